"""The initial configuration run: until the user's properties say that it is complete, a start has few words left."""

import pytest

from world import (CONFIG, HEAD, INSTALL_AREA, JAVA, LAUNCHER, STARTUP, USER_PROPERTIES, WORKSPACE, areas, lines,
                   read, system)

GROUP = ["config.initial.1=-application", "config.initial.2=org.init", "config.initial.3=-initialCompleteFlag",
         "config.initial.4=init.done"]
WORDS = ["-application", "org.init", "-initialCompleteFlag", "init.done"]


def command(*platform, workspace=WORKSPACE, configuration="user", jvm=(), more=()):
    return (HEAD + list(platform) + areas(workspace) + list(more) + STARTUP + list(jvm)
            + system(workspace, configuration) + INSTALL_AREA)


def started(world, *words, group=GROUP, done=None):
    world.install("user", *group)
    world.base_properties(*([] if done is None else [done]))
    assert world.run(*words).status == 0
    return world.only_platform().argv


def test_the_words_of_the_group_are_an_extension(world):
    """Merged like any other, the name of the flag among them."""
    assert started(world) == command(*WORDS)


# ---- which words survive

@pytest.mark.parametrize("word", ["-debug", "-debugger", "-debugFile"])
def test_the_first_word_that_begins_like_debug_survives(world, word):
    """The second and every longer one of them is dropped."""
    argv = started(world, "-x", word, "-debug", "-debug2", "-y")
    expected = command(word, *WORDS)
    if word == "-debug":
        expected.remove("--launcher.suppressErrors")
    assert argv == expected


@pytest.mark.parametrize("word", ["-console", "-consoleLog"])
def test_the_first_word_that_begins_like_console_survives(world, word):
    assert started(world, "-x", word, "-console", "-consoleLog", "-y") == command(word, *WORDS)


@pytest.mark.parametrize("word", ["-noExit", "-noExitNow"])
def test_the_first_word_that_begins_like_no_exit_survives(world, word):
    assert started(world, "-x", word, "-noExit", "-noExit2", "-y") == command(word, *WORDS)


def test_the_first_workspace_survives_with_its_value(world):
    """The second is dropped; its value is a word like any other."""
    assert started(world, "-data", "/mnt/w", "-x", "-data", "/mnt/v") == command(*WORDS, workspace="/mnt/w")


def test_the_value_of_the_workspace_is_no_option(world):
    """Whatever it looks like, it is copied with the option and not looked at: a second such word survives."""
    for folder in ("logs", ".config/org.eclipse.update", "applications/eclipse/features",
                   "applications/eclipse/plugins"):
        world.folder("/mnt/-debug/" + folder)
    world.install("user", *GROUP)
    assert world.run("-data", "-debug", "-debug2", "-debug3", cwd="/mnt").status == 0
    expected = command("-debug2", *WORDS, workspace="-debug")
    expected.remove("--launcher.suppressErrors")
    assert world.only_platform().argv == expected


def test_a_word_that_only_begins_like_the_workspace_takes_the_next_with_it(world):
    """And then the workspace itself is the second, so it is dropped; the workspace of the start was chosen before, and
    the command asks again with the words that are left."""
    assert started(world, "-dataset", "-x", "-data", "/mnt/w") == command("-dataset", "-x", *WORDS)


def test_a_workspace_without_a_value(world):
    """It is copied alone; the extension's first word then follows it."""
    assert started(world, "-data", group=["config.initial.1=/mnt/v", "config.initial.2=-initialCompleteFlag",
                                          "config.initial.3=init.done"]) == command(
                                              "-initialCompleteFlag", "init.done", workspace="/mnt/v")


def test_the_order_of_the_line_is_kept(world):
    assert started(world, "-noExit", "-console", "-data", "/mnt/w") == command(
        "-noExit", "-console", *WORDS, workspace="/mnt/w")


@pytest.mark.parametrize("word", [
    "-foo", "-Debug", "-noexit", "--console", "-dat", "-restart2", "-nl", "-resetconfig", "-velmoraWait",
    "-provManifest", "-application", "-product", "-pb4l", "-dir", "-perfJar", "-consol", "plain", ""])
def test_every_other_word_is_dropped(world, word):
    """Alone or with a value behind it."""
    assert started(world, word, "value") == command(*WORDS)


def test_a_vm_of_the_line_is_dropped(world):
    """The installation's own is back."""
    world.install("user", "jvm.location=" + JAVA, *GROUP)
    world.run("-vm", "/opt/java")
    assert world.only_platform().argv == command(*WORDS, more=["-vm", JAVA])


def test_jvm_words_are_dropped_and_named_ones_stay(world):
    """What stands behind "-vmargs" goes, unless it begins like a word that survives; named JVM arguments were taken
    from the line before."""
    assert started(world, "vmarg.a=-A", "-vmargs", "-Xmx1g", "-debug2", "vmarg.b=-B") == command(
        "-debug2", *WORDS, jvm=["-A", "-B"])


def test_named_jvm_words_of_the_group_come_after_those_of_the_files(world):
    """Those of an ordinary extension would come before."""
    world.install("user", *GROUP, "config.initial.5=vmarg.a=-of-group", "config.initial.6=vmarg.c=-C")
    world.base_properties("vmarg.a=-A")
    world.jvm_properties("vmarg.b=-B")
    world.run()
    assert world.only_platform().argv == command(*WORDS, jvm=["-A", "-B", "-C"])


def test_the_vm_of_the_group_is_the_commands_alone(world):
    """The JVM's file was looked for where the first words said."""
    world.install("user", "jvm.location=/mnt/o/jvm/bin/java", *GROUP, "config.initial.5=-vm",
                  "config.initial.6=/mnt/g/jvm/bin/qvw")
    world.write("/mnt/g/jvm/bin/qv")
    for name in ("l", "o", "g"):
        world.jvm_properties("-Dof=" + name, "-Dhome=${prop.java.home}", root="/mnt/%s/jvm/" % name)
    world.run("-vm", "/mnt/l/jvm/bin/java", "-console")
    expected = command("-console", *WORDS, more=["-vm", "/mnt/g/jvm/bin/qv"])
    at = expected.index(*INSTALL_AREA)
    assert world.only_platform().argv == expected[:at] + ["-Dof=l", "-Dhome=/mnt/l"] + expected[at:]
    assert 'QVMRL0021I: VM specified is "/mnt/l/jvm/bin/java"\n' in world.log()


def test_another_extension_is_dropped(world):
    """Its words are gone, its named JVM arguments were taken before."""
    assert started(world, "-config", "a", group=[
        *GROUP, "config.a.1=-of-a", "config.a.2=vmarg.a=-A"]) == command(*WORDS, jvm=["-A"])


def test_the_word_for_a_restart_is_dropped_but_the_start_is_one(world):
    """The console's word survives the reduction, and vanishes from the command of a restart."""
    assert started(world, "-restart", "-console") == command(*WORDS)


def test_all_words_are_recorded(world):
    """Those of the line: a restart is a start like this one."""
    started(world, "-foo", "-console")
    assert read(CONFIG + "/args.properties") == lines(
        "arg0=" + LAUNCHER, "arg1=-foo", "arg2=-console", "argc=3", "com.vantor.rcp.core.internal.librarypath=")


# ---- when it is required

@pytest.mark.parametrize("value", ["true", "true!", "trueish", "true false"])
def test_a_flag_that_begins_with_true_ends_it(world, value):
    """Only the first four characters are compared."""
    assert started(world, "-foo", done="init.done=" + value) == command("-foo")


@pytest.mark.parametrize("value", ["", "tru", "True", "TRUE", "false", "1", "nottrue"])
def test_any_other_flag_requires_it(world, value):
    assert started(world, "-foo", done="init.done=" + value) == command(*WORDS)


def test_the_flag_is_compared_as_it_stands_in_the_file(world):
    """A placeholder in it is not resolved yet."""
    world.install("user", *GROUP)
    world.base_properties("init.done=${env.X}")
    assert world.run("-foo", env={"X": "true"}).status == 0
    assert world.only_platform().argv == command(*WORDS)


def test_the_next_start_after_it_is_an_ordinary_one(world):
    """The platform writes the flag into the user's properties."""
    world.install("user", *GROUP)
    world.plan("append", USER_PROPERTIES, "init.done=true\n", start=0)
    world.run("-velmoraWait", "-console")
    world.run("-velmoraWait", "-foo")
    assert [platform.argv for platform in world.platforms()] == [
        command("-console", *WORDS), command("-velmoraWait", "-foo")]


def test_the_flag_counts_only_among_the_users_properties(world):
    assert started(world, group=[*GROUP, "init.done=true"]) == command(*WORDS)


@pytest.mark.parametrize("configuration", ["user", "userpb", "multiuser"])
def test_the_configurations_that_have_it(world, configuration):
    world.install(configuration, *GROUP)
    world.run("-foo")
    assert world.only_platform().argv == command(*WORDS, configuration=configuration)


@pytest.mark.parametrize("configuration", ["lockdown", "serial.multiuser"])
def test_the_configurations_that_have_none(world, configuration):
    world.install(configuration, *GROUP)
    world.plan("write", "/mnt/home/.exitData", "bye")
    world.run("-foo")
    assert world.only_platform().argv == command("-foo", configuration=configuration)


def test_a_service_has_none(world):
    """Not even with a damaged group."""
    world.install("service", "jvm.location=" + JAVA, "config.initial.7=x")
    world.stand_in(JAVA)
    assert world.run("-foo").status == 0
    assert "-foo" in world.only_platform().argv


def test_a_daemon_process_has_it_too(world):
    world.install("user", *GROUP)
    world.plan("wait")
    world.run("-foo")
    main = world.platform()
    world.run("-foo")
    assert world.platform(1).argv == command(*WORDS, more=["-useDaemon", str(main.pid)])


# ---- the group

def refused(world, message, *group):
    world.install("user", *group)
    world.fatal(world.run(), message)


def numbered(*words):
    return ["config.initial.%d=%s" % pair for pair in enumerate(words, 1)]


NOT_FOUND = "QVMRL0115E: Invalid config.initial arguments. -initialCompleteFlag not found"


@pytest.mark.parametrize("words", [
    ["-application", "org.init"],
    ["-application", "org.init", "-initialCompleteFlag"],
    ["-initialCompleteFlag"],
    ["-InitialCompleteFlag", "done"],
    ["-initialCompleteFla", "done"],
])
def test_a_group_without_the_flag_or_with_it_at_the_end(world, words):
    refused(world, NOT_FOUND, *numbered(*words))


def test_the_flag_is_known_by_its_beginning(world):
    """By its first twenty characters; the first of two counts."""
    assert started(world, "-foo", group=numbered("-initialCompleteFlags", "one", "-initialCompleteFlag", "two"),
                   done="one=true") == command("-foo")


@pytest.mark.parametrize("group, missing", [
    (["config.initial.2=-initialCompleteFlag", "config.initial.3=done"], "config.initial.1"),
    (["config.initial.1=-initialCompleteFlag", "config.initial.3=done"], "config.initial.2"),
    (["config.initial.0=x", "config.initial.1=-initialCompleteFlag", "config.initial.2=done"], "config.initial.3"),
    (["config.initial.one=x"], "config.initial.1"),
])
def test_a_number_that_is_missing(world, group, missing):
    """As many numbers as there are keys of the group, from 1 on."""
    refused(world, "QVMRL0114E: Invalid config.initial arguments. %s not found" % missing, *group)


@pytest.mark.parametrize("last, missing", [(3, 4), (4, 5)])
def test_a_number_twice_counts_twice(world, last, missing):
    """So the number behind the last one is asked for."""
    refused(world, "QVMRL0114E: Invalid config.initial arguments. config.initial.%d not found" % missing,
            "config.initial.1=-initialCompleteFlag", "config.initial.2=done", "config.initial.2=other",
            *("config.initial.%d=x" % number for number in range(3, last + 1)))


@pytest.mark.parametrize("done, required", [("done=true", False), ("other=true", True)])
def test_of_a_number_twice_the_first_counts(world, done, required):
    """The tenth word stands for the first, which is missing, and for itself: so ten keys give ten words although the
    second is there twice."""
    argv = started(world, "-foo", group=[
        "config.initial.10=-initialCompleteFlag", "config.initial.2=done", "config.initial.2=other",
        *("config.initial.%d=x" % number for number in range(3, 10))], done=done)
    # The merge looks for the first word by its whole key, and ends at once.
    assert argv == (command() if required else command("-foo"))


def test_a_property_without_a_name_hides_the_group(world):
    """What stands behind it is not looked for."""
    assert started(world, "-foo", group=["=x", *GROUP]) == command("-foo")


def test_a_property_without_a_name_hides_a_damaged_end_of_the_group(world):
    assert started(world, group=[*GROUP, "=x", "config.initial.7=x"]) == command(*WORDS)


def test_every_key_of_the_group_counts(world):
    """That of a restart executable too, so with four words a fifth is asked for."""
    refused(world, "QVMRL0114E: Invalid config.initial arguments. config.initial.5 not found",
            *GROUP, "config.initial.restartExe.linux=/x")


def test_a_key_that_only_resembles_the_group_does_not_count(world):
    assert started(world, group=[*GROUP, "config.initialx.1=x", "config.initial=x"]) == command(*WORDS)


def test_ten_stands_for_one_when_it_comes_first(world):
    """The test for a number is one for the key's beginning: the tenth word is in both places, and the first is never
    seen. Here the flag is in the first."""
    words = numbered("-initialCompleteFlag", "done", *["-w%d" % n for n in range(3, 11)])
    refused(world, NOT_FOUND, words[-1], *words[:-1])


def test_ten_stands_for_one_and_may_be_the_flag(world):
    """Then the second word names the property."""
    words = numbered("-w1", "done", *["-w%d" % n for n in range(3, 10)], "-initialCompleteFlag")
    assert started(world, "-foo", group=[words[-1], *words[:-1]], done="done=true") == command("-foo")


def test_ten_behind_one_is_itself(world):
    words = numbered("-initialCompleteFlag", "done", *["-w%d" % n for n in range(3, 11)])
    assert started(world, "-foo", group=words, done="done=true") == command("-foo")


def test_the_order_in_the_file_does_not_matter_below_ten(world):
    assert started(world, group=GROUP[::-1]) == command(*WORDS)


@pytest.mark.parametrize("done, words", [("=true", ["-foo"]), (None, ["-initialCompleteFlag"])])
def test_an_empty_word_of_the_group_counts_as_a_word(world, done, words):
    """For the number and as the flag's follower: the property without a name is asked for. For the merge it is none."""
    assert started(world, "-foo", group=["config.initial.1=-initialCompleteFlag", "config.initial.2="],
                   done=done) == command(*words)


def test_the_group_is_looked_at_before_the_command_is_built(world):
    world.install("user", "config.initial.1=x", "eclipse.name=gone")
    world.fatal(world.run(), NOT_FOUND)


def test_without_a_group_there_is_nothing_to_ask(world):
    world.install()
    world.run("-foo")
    assert world.only_platform().argv == command("-foo")
