"""The JVM's arguments: the named ones with their precedence and order, "-vmargs", the "-X" words, the class path."""

import pytest

from world import HEAD, INSTALL_AREA, STARTUP, TEMP_LOG, WORKSPACE, areas, read, system

AFTER = system() + INSTALL_AREA


def test_the_command_line_goes_before_the_files(world):
    world.install()
    world.base_properties("vmarg.Xmx=-Xmx256m")
    world.jvm_properties("vmarg.Xmx=-Xmx128m")
    world.run("vmarg.Xmx=-Xmx512m")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Xmx512m"] + AFTER


def test_the_users_properties_go_before_the_jvms(world):
    world.install()
    world.base_properties("vmarg.a=-Dof=user")
    world.jvm_properties("vmarg.a=-Dof=jvm", "vmarg.b=-Db")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Dof=user", "-Db"] + AFTER


def test_the_command_line_goes_before_the_extension_and_that_before_the_files(world):
    world.install("user", "config.e.1=vmarg.a=-Dof=extension", "config.e.2=vmarg.b=-Dof=extension")
    world.base_properties("vmarg.a=-Dof=file", "vmarg.b=-Dof=file", "vmarg.c=-Dof=file")
    world.run("vmarg.a=-Dof=line", "-config", "e")
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + ["-Dof=line", "-Dof=extension", "-Dof=file"] + AFTER)


def test_the_first_of_equal_names_counts_in_each_source(world):
    world.install()
    world.base_properties("vmarg.f=-Df1", "vmarg.f=-Df2")
    world.run("vmarg.a=-Da1", "vmarg.a=-Da2")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Da1", "-Df1"] + AFTER


def test_the_names_are_sorted_by_their_characters(world):
    """Not in the order of the sources: capitals first, "a10" before "a2"."""
    world.install()
    world.base_properties("vmarg.b=-Xb", "vmarg.a2=-Xa2", "vmarg.ä=-Xae", "vmarg.a10=-Xa10", "vmarg.a=-Xa")
    world.run("vmarg.B=-XB", "vmarg.c=-Xc", "vmarg.=-Xnone")
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + ["-Xnone", "-XB", "-Xa", "-Xa10", "-Xa2", "-Xb", "-Xc", "-Xae"] + AFTER)


def test_a_value_is_everything_after_the_first_equals_sign(world):
    world.install()
    world.run("vmarg.a=-Dx=1=2")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Dx=1=2"] + AFTER


def test_an_empty_value_cancels_a_name(world):
    """Nothing is emitted for it, and no lower source can fill it."""
    world.install()
    world.base_properties("vmarg.Xmx=-Xmx256m", "vmarg.Xss=")
    world.jvm_properties("vmarg.Xmx=-Xmx128m", "vmarg.Xss=-Xss1m")
    world.run("vmarg.Xmx=")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + AFTER


def test_words_that_only_look_like_named_arguments_travel_on(world):
    """The prefix has its case and its point."""
    world.install()
    world.run("Vmarg.x=1", "vmargx=1", "-vmarg.x=1")
    assert world.only_platform().argv == HEAD + ["Vmarg.x=1", "vmargx=1", "-vmarg.x=1"] + areas() + STARTUP + AFTER


def test_a_named_argument_is_taken_from_anywhere_on_the_line(world):
    world.install()
    world.run("vmarg.b=-Xb", "-foo", "-vmargs", "-Xc", "vmarg.a=-Xa", "-Xd")
    assert world.only_platform().argv == (
        HEAD + ["-foo"] + areas() + STARTUP + ["-Xc", "-Xd", "-Xa", "-Xb"] + AFTER)


def test_a_named_argument_is_one_word_whatever_it_holds(world):
    world.install()
    world.run("vmarg.a=-Da=x y  z")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Da=x y  z"] + AFTER


def test_placeholders_in_named_arguments(world):
    """Of the line and of the files, standard ones and the others."""
    world.install()
    world.base_properties("vmarg.b=-Db=${rcp.home}:${prop.p}", "p=1")
    world.run("vmarg.a=-Da=${workspace.location}:${env.USER}", "vmarg.c=-Dc=${env.NONE,x}:${rcp.data}")
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + ["-Da=%s:anna" % WORKSPACE, "-Db=/mnt/app:1", "-Dc=x:" + WORKSPACE] + AFTER)


def test_a_named_argument_without_a_value_sign(world):
    """Refused before anything is made."""
    world.install()
    start = world.run("-foo", "vmarg.Xmx")
    world.fatal(start, "QVMRL0033E: velmora invoked with an invalid vmarg.")
    assert read(TEMP_LOG).startswith('QVMRL0030I: velmora main arguments="/mnt/app/rcp/velmora, -foo, vmarg.Xmx, "\n\n')


def test_a_named_argument_without_a_value_sign_in_an_extension(world):
    world.install("user", "config.e.1=vmarg.Xmx")
    world.fatal(world.run("-config", "e"), "QVMRL0128E: velmora invoked with an invalid vmarg.")


def test_the_lines_jvm_words_stand_before_the_named_ones(world):
    world.install()
    world.base_properties("vmarg.a=-Xa")
    world.run("-vmargs", "-Xfoo", "-Dbar=1")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Xfoo", "-Dbar=1", "-Xa"] + AFTER


# ---- the fix for a JVM without a console

NO_CONSOLE = "vmfix.noconsole=-Dlog=${workspace.location}/a${workspace.location}"
FIXED = "-Dlog=" + WORKSPACE + "/a" + WORKSPACE


def test_without_a_console_the_fix_is_added(world):
    """All placeholders of a user's property are resolved before the fix replaces its own first one."""
    world.install()
    world.base_properties(NO_CONSOLE, "vmarg.a=-Xa")
    world.run("-vmargs", "-Xfoo")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Xfoo", FIXED, "-Xa"] + AFTER


def test_with_a_console_there_is_no_fix(world):
    world.install()
    world.base_properties(NO_CONSOLE)
    world.run("-console")
    assert world.only_platform().argv == HEAD + ["-console"] + areas() + STARTUP + AFTER


def test_on_a_restart_the_fix_is_added_even_with_a_console(world):
    """The word for the console vanishes from the command then."""
    world.install()
    world.base_properties(NO_CONSOLE)
    world.run("-console", "-restart")
    assert world.only_platform().argv == HEAD + areas() + STARTUP + [FIXED] + AFTER


def test_a_console_log_is_no_console_for_the_fix(world):
    world.install()
    world.base_properties(NO_CONSOLE)
    world.run("-consoleLog")
    assert world.only_platform().argv == HEAD + ["-consoleLog"] + areas() + STARTUP + [FIXED] + AFTER


def test_the_first_property_of_that_prefix_is_the_fix(world):
    """Its separators are turned."""
    world.install()
    world.base_properties("vmfix.noconsole.b=-Db\\\\c", "vmfix.noconsole=-Da", "vmfix.noconsole.a=-Dz")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + STARTUP + ["-Db/c"] + AFTER


@pytest.mark.parametrize("library", ["/mnt/jvm/default.ee", "/mnt/jvm/jvm.dll"])
def test_a_jvm_that_is_a_library_gets_no_fix(world, library):
    world.install("user", "jvm.location=" + library)
    world.base_properties(NO_CONSOLE)
    world.run()
    assert world.only_platform().argv == HEAD + areas() + ["-vm", library] + STARTUP + AFTER


# ---- "-X" words, boot class path, class path

def test_x_words_are_key_and_value_joined(world):
    """Whatever stood between them: a blank goes, a colon or an equals sign stays."""
    world.install()
    world.base_properties("-Xss", "-Xmx 1g", "-Xshareclasses:name=rcp,nonfatal", "-Xa=b", "-XX:+UseIt")
    world.jvm_properties("-Xmx   2g", "-Xzero=")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + AFTER
        + ["-Xss", "-Xmx1g", "-Xshareclasses:name=rcp,nonfatal", "-Xa=b", "-XX:+UseIt", "-Xmx2g", "-Xzero="])


def test_the_boot_class_path(world):
    """Put in front before appended, whatever the order in the file; behind the "-X" words."""
    world.install()
    world.base_properties("Xbootclasspath.append=/a.jar", "Xbootclasspath.prepend=${rcp.home}/p.jar", "-Xss1m")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + AFTER
        + ["-Xss1m", "-Xbootclasspath/p:/mnt/app/p.jar", "-Xbootclasspath/a:/a.jar"])


def test_an_empty_boot_class_path_is_set(world):
    world.install()
    world.base_properties("Xbootclasspath.append=", "Xbootclasspath.prepend=")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + AFTER + ["-Xbootclasspath/p:", "-Xbootclasspath/a:"])


def test_without_a_class_path_there_are_no_words_for_it(world):
    world.install()
    world.run()
    assert "-cp" not in world.only_platform().argv


def test_the_class_path_is_one_word(world):
    world.install()
    world.base_properties("cp=${rcp.home}/a.jar:/b c.jar")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + STARTUP + AFTER + ["-cp", "/mnt/app/a.jar:/b c.jar"]


def test_an_empty_class_path_is_set(world):
    world.install()
    world.base_properties("cp=")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + STARTUP + AFTER + ["-cp", ""]
