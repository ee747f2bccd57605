"""Which executable of the JVM is named: the chosen one, its console variant, one under another name."""

import pytest

from world import APP, HEAD, INSTALL_AREA, STARTUP, areas, read, system

AFTER = STARTUP + system() + INSTALL_AREA
PAIRS = [("javaw", "java"), ("qvw", "qv"), ("quillonw", "quillon")]


def vm_words(world):
    argv = world.only_platform().argv
    return argv[argv.index("-configuration") + 2:argv.index("-startup")]


def test_without_a_vm_no_words_for_it(world):
    world.install()
    world.run()
    assert world.only_platform().argv == HEAD + areas() + AFTER


def test_the_vm_of_the_installation(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/java")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + ["-vm", "/mnt/jvm/bin/java"] + AFTER


def test_the_vm_of_the_command_line_goes_first(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/java")
    world.run("-vm", "/mnt/other/bin/java")
    assert world.only_platform().argv == HEAD + areas() + ["-vm", "/mnt/other/bin/java"] + AFTER


def test_the_vm_of_the_command_line_is_used_as_written(world):
    """Backslashes and doubled slashes stay; a standard placeholder is replaced like in any word of the line."""
    world.install()
    world.run("-vm", "C:\\jre//bin\\${rcp.home}")
    assert vm_words(world) == ["-vm", "C:\\jre//bin\\/mnt/app"]


def test_a_vm_that_is_present_and_empty(world):
    world.install()
    world.base_properties("vm=")
    world.run()
    assert vm_words(world) == ["-vm", ""]
    assert 'QVMRL0119I: VM specified is "external JVM"\n' in world.log()


@pytest.mark.parametrize("words", [["-vm"], ["-vm", ""], ["-foo", "-vm"]])
def test_the_vm_option_without_a_path(world, words):
    """The word is missing or empty; no VM of the installation takes its place."""
    world.install("user", "jvm.location=/mnt/jvm/bin/java")
    world.fatal(world.run(*words), "QVMRL0079E: -vm on command line must be followed by a valid jvm path.")


@pytest.mark.parametrize("windowed, console", PAIRS)
@pytest.mark.parametrize("word", ["-console", "-consoleLog"])
def test_with_a_console_the_console_variant_is_named(world, windowed, console, word):
    world.install("user", "jvm.location=/mnt/jvm/bin/" + windowed)
    world.write("/mnt/jvm/bin/" + console)
    world.run(word)
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/" + console]


def test_a_restart_with_a_console_takes_the_console_variant_too(world):
    """Though the word itself is left out of its command, and the fix for a JVM without a console is in it."""
    world.install("user", "jvm.location=/mnt/jvm/bin/javaw")
    world.base_properties("vmfix.noconsole=-Dfix")
    world.write("/mnt/jvm/bin/java")
    world.run("-restart", "-console")
    assert world.only_platform().argv == (
        HEAD + areas() + ["-vm", "/mnt/jvm/bin/java"] + STARTUP + ["-Dfix"] + system() + INSTALL_AREA)


@pytest.mark.parametrize("windowed, console", PAIRS)
def test_a_console_variant_that_is_missing(world, windowed, console):
    """The message names the variant, not what was asked for."""
    world.install("user", "jvm.location=/mnt/jvm/bin/" + windowed)
    world.write("/mnt/jvm/bin/" + windowed)
    world.fatal(world.run("-console"), "QVMRL0003E: Specified vm (/mnt/jvm/bin/%s) does not exist!" % console,
                "No such file or directory")


def test_a_console_variant_that_cannot_be_read_counts_as_missing(world):
    """Though it could be executed."""
    world.install("user", "jvm.location=/mnt/jvm/bin/javaw")
    world.write("/mnt/jvm/bin/java", mode=0o111)
    world.fatal(world.run("-console"), "QVMRL0003E: Specified vm (/mnt/jvm/bin/java) does not exist!",
                "Permission denied")


def test_without_a_console_the_windowed_variant_stays(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/javaw")
    world.write("/mnt/jvm/bin/java")
    world.run()
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/javaw"]


@pytest.mark.parametrize("name", ["java", "qv", "quillon", "jre", "javaw.bin", "JAVAW"])
def test_with_a_console_other_names_stay(world, name):
    world.install("user", "jvm.location=/mnt/jvm/bin/" + name)
    world.run("-console")
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/" + name]


def test_the_end_of_the_path_is_compared_not_its_last_part(world):
    """"xjavaw" ends with "javaw"."""
    world.install("user", "jvm.location=/mnt/jvm/bin/xjavaw")
    world.write("/mnt/jvm/bin/xjava")
    world.run("-console")
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/xjava"]


@pytest.mark.parametrize("name", ["java", "qv", "quillon"])
def test_a_console_executable_under_another_name(world, name):
    world.install("user", "jvm.location=/mnt/jvm/bin/" + name, "java.exe.name.linux=myjava")
    world.write("/mnt/jvm/bin/myjava")
    world.run()
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/myjava"]


@pytest.mark.parametrize("name", ["javaw", "qvw", "quillonw"])
def test_a_windowed_executable_under_another_name(world, name):
    world.install("user", "jvm.location=/mnt/jvm/bin/" + name, "javaw.exe.name.linux=myjavaw")
    world.write("/mnt/jvm/bin/myjavaw")
    world.run()
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/myjavaw"]


def test_another_name_that_does_not_exist_changes_nothing(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/java", "java.exe.name.linux=myjava")
    assert world.run().status == 0
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/java"]


def test_each_other_name_is_for_its_own_kind(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/javaw", "java.exe.name.linux=myjava")
    world.write("/mnt/jvm/bin/myjava")
    world.run()
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/javaw"]


def test_the_names_of_another_system_are_not_looked_at(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/java", "java.exe.name.win32=myjava", "java.exe.name=myjava")
    world.write("/mnt/jvm/bin/myjava")
    world.run()
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/java"]


def test_the_console_variant_is_chosen_before_the_other_name(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/javaw", "java.exe.name.linux=myjava")
    world.write("/mnt/jvm/bin/java")
    world.write("/mnt/jvm/bin/myjava")
    world.run("-console")
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/myjava"]


def test_both_other_names_are_tried_one_after_the_other(world):
    """The console name ends in a windowed one here, so the second rule takes up what the first has made."""
    world.install("user", "jvm.location=/mnt/jvm/bin/java", "java.exe.name.linux=javaw", "javaw.exe.name.linux=last")
    world.write("/mnt/jvm/bin/javaw")
    world.write("/mnt/jvm/bin/last")
    world.run()
    assert vm_words(world) == ["-vm", "/mnt/jvm/bin/last"]


@pytest.mark.parametrize("library", ["/mnt/jvm/bin/javaw.ee", "/mnt/jvm/bin/java.dll"])
def test_a_library_is_passed_on_unchanged(world, library):
    """Neither the console nor another name counts."""
    world.install("user", "jvm.location=" + library, "java.exe.name.linux=my", "javaw.exe.name.linux=my")
    world.run("-console")
    assert vm_words(world) == ["-vm", library]


def test_a_name_that_ends_like_a_library_in_capitals_is_none(world):
    world.install("user", "jvm.location=/mnt/jvm/default.EE")
    world.base_properties("vmfix.noconsole=-Dfix")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + ["-vm", "/mnt/jvm/default.EE"] + STARTUP + ["-Dfix"] + system() + INSTALL_AREA)


def test_in_a_service_the_chosen_variant_is_the_program(world):
    world.install("service", "jvm.location=/mnt/jvm/bin/javaw", "java.exe.name.linux=myjava")
    world.write("/mnt/jvm/bin/java")
    world.stand_in("/mnt/jvm/bin/myjava")
    world.run("-console")
    platform = world.only_platform()
    assert (platform.argv[0], platform.program) == ("/mnt/jvm/bin/myjava", "/mnt/jvm/bin/myjava")
    assert "-vm" not in platform.argv


def test_in_a_service_a_library_needs_no_fix(world):
    world.install("service", "jvm.location=/mnt/jvm/x.ee")
    world.base_properties("vmfix.noconsole=-Dfix")
    world.stand_in("/mnt/jvm/x.ee")
    world.run()
    assert world.only_platform().argv[:2] == ["/mnt/jvm/x.ee", "-Drcp.home=/mnt/app"]


def test_in_a_service_the_vm_of_the_line_is_the_program(world):
    """Its words go nowhere else."""
    world.install("service", "jvm.location=/mnt/jvm/bin/java")
    world.stand_in("/mnt/other/java")
    world.run("-vm", "/mnt/other/java")
    platform = world.only_platform()
    assert platform.argv[0] == "/mnt/other/java"
    assert platform.argv.count("/mnt/other/java") == 1


def test_the_vm_path_is_logged_in_its_usual_form(world):
    """Though the command has it as written. Only the first ${rcp.home} of the property would be replaced here, but the
    word on the line holds it as it was typed."""
    world.install()
    world.run("-vm", "${rcp.home}\\jvm\\bin\\java")
    assert 'QVMRL0021I: VM specified is "%s/jvm/bin/java"\n' % APP in world.log()
    assert vm_words(world) == ["-vm", APP + "\\jvm\\bin\\java"]
    assert "QVMRL0119I" not in read("/mnt/home/VANTOR/RCP/abc/anna/logs/velmora.log")
