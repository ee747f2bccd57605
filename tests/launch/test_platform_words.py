"""The words that the platform reads: the user's own ones, the two areas, the defaults, the system properties."""

import pytest

from world import HEAD, INSTALL_AREA, STARTUP, WORKSPACE, areas, read, system, user_logs

TAIL = STARTUP + system() + INSTALL_AREA


def test_the_workspace_comes_back_in_its_own_place(world):
    """The user's "-data" is taken out, what follows "-vmargs" is left to the JVM."""
    world.install()
    world.run("-data", "/mnt/w", "-foo", "-vmargs", "-Xmx1g")
    assert world.only_platform().argv == (
        HEAD + ["-foo"] + areas("/mnt/w") + STARTUP + ["-Xmx1g"] + system("/mnt/w") + INSTALL_AREA)


def test_words_that_are_the_launchers_own_are_dropped(world):
    """Four with their value, "-resetconfig" alone. The configuration area cannot be chosen."""
    world.install()
    world.run("-a", "-data", "/mnt/w", "-b", "-configuration", "/mnt/c", "-c", "-vm", "/mnt/v", "-d", "-rcp_old_pid",
              "7", "-e", "-resetconfig", "-f")
    assert world.only_platform().argv == (
        HEAD + ["-a", "-b", "-c", "-d", "-e", "-f"] + areas("/mnt/w") + ["-vm", "/mnt/v"] + STARTUP
        + system("/mnt/w") + INSTALL_AREA)


def test_only_the_first_of_a_dropped_word_is_dropped(world):
    """A later repeat, and its value, are ordinary words."""
    world.install()
    world.run("-data", "/mnt/w", "-resetconfig", "-data", "/mnt/x", "-vm", "/v", "-vm", "/u", "-resetconfig",
              "-configuration", "/c", "-configuration", "/d", "-rcp_old_pid", "1", "-rcp_old_pid", "2")
    assert world.only_platform().argv == (
        HEAD + ["-data", "/mnt/x", "-vm", "/u", "-resetconfig", "-configuration", "/d", "-rcp_old_pid", "2"]
        + areas("/mnt/w") + ["-vm", "/v"] + STARTUP + system("/mnt/w") + INSTALL_AREA)


def test_a_dropped_word_at_the_end_has_no_value(world):
    world.install()
    world.run("-foo", "-configuration")
    assert world.only_platform().argv == HEAD + ["-foo"] + areas() + TAIL


def test_the_users_words_end_at_the_first_vmargs(world):
    """A second "-vmargs" is a word for the JVM."""
    world.install()
    world.run("-foo", "-vmargs", "-Xa", "-vmargs", "-Xb")
    assert world.only_platform().argv == (
        HEAD + ["-foo"] + areas() + STARTUP + ["-Xa", "-vmargs", "-Xb"] + system() + INSTALL_AREA)


def test_options_are_whole_words_in_their_own_case(world):
    """No abbreviation, no "--name=value", no folding: all of these travel on."""
    world.install()
    words = ["-Data", "-dat", "--data=/mnt/w", "-data=/mnt/w", "-datax", "-Console", "-CONSOLE", "-VmArgs"]
    world.run(*words)
    assert world.only_platform().argv == HEAD + words + areas() + TAIL


DEFAULTS = ["application=org.app", "plugincustomization=/mnt/c.ini", "product=org.prod", "personality=org.pers"]


def test_defaults_stand_in_a_fixed_order(world):
    world.install()
    world.base_properties(*reversed(DEFAULTS))
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + ["-application", "org.app", "-plugincustomization", "/mnt/c.ini", "-product", "org.prod",
                          "-personality", "org.pers"] + TAIL)


def test_the_users_own_word_replaces_each_default(world):
    world.install()
    world.base_properties(*DEFAULTS)
    words = ["-personality", "p", "-product", "q", "-plugincustomization", "r", "-application", "s"]
    world.run(*words)
    assert world.only_platform().argv == HEAD + words + areas() + TAIL


def test_a_word_after_vmargs_replaces_the_default_too(world):
    """The whole line is searched, though the word itself goes to the JVM."""
    world.install()
    world.base_properties("application=org.app")
    world.run("-vmargs", "-application")
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + ["-application"] + system() + INSTALL_AREA)


def test_the_product_of_the_installation_goes_first(world):
    world.install("user", "product=of.the.launcher")
    world.base_properties("product=of.the.user")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + ["-product", "of.the.launcher"] + TAIL


def test_the_other_defaults_are_not_looked_for_in_the_launchers_properties(world):
    world.install("user", "application=org.app", "personality=org.pers", "plugincustomization=/mnt/c.ini")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + TAIL


def test_defaults_that_are_present_and_empty_are_empty_words(world):
    world.install("user", "osgi.splashPath=")
    world.base_properties("application=", "plugincustomization=", "product=", "personality=")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + ["-application", "", "-plugincustomization", "", "-product", "", "-personality", ""]
        + STARTUP + system()[:2] + ["-Dosgi.splashPath="] + system()[2:] + INSTALL_AREA)


def test_an_option_with_a_default_as_the_last_word(world):
    """It is passed on alone, and no default is added for it."""
    world.install()
    world.base_properties("application=org.app")
    world.run("-application")
    assert world.only_platform().argv == HEAD + ["-application"] + areas() + TAIL


@pytest.mark.parametrize("option", ["-application", "-product", "-personality", "-plugincustomization"])
def test_the_word_after_such_an_option_is_passed_on_whatever_it_is(world, option):
    """Even "-data", which still counts as the workspace's option; its value is then an ordinary word."""
    world.install()
    world.run(option, "-data", "/mnt/w", "-foo")
    assert world.only_platform().argv == (
        HEAD + [option, "-data", "/mnt/w", "-foo"] + areas("/mnt/w") + STARTUP + system("/mnt/w") + INSTALL_AREA)


def test_vmargs_as_the_value_of_such_an_option(world):
    """The pair is passed on, the user's words end behind it, and the JVM still gets what follows."""
    world.install()
    world.run("-product", "-vmargs", "-Xa")
    assert world.only_platform().argv == (
        HEAD + ["-product", "-vmargs"] + areas() + STARTUP + ["-Xa"] + system() + INSTALL_AREA)


def test_only_the_first_of_such_an_option_passes_the_next_word_on(world):
    """The word after a repeat is what it always is."""
    world.install()
    world.run("-product", "a", "-product", "-data", "/mnt/w", "-x")
    world.all_ended()
    world.run("-personality", "a", "-personality", "-vmargs", "-Xa", "-data", "/mnt/v")
    assert [platform.argv for platform in world.platforms()] == [
        HEAD + ["-product", "a", "-product", "-x"] + areas("/mnt/w") + STARTUP + system("/mnt/w") + INSTALL_AREA,
        HEAD + ["-personality", "a", "-personality"] + areas("/mnt/v") + STARTUP + ["-Xa", "-data", "/mnt/v"]
        + system("/mnt/v") + INSTALL_AREA]


def test_what_the_installation_names_is_passed_on_as_it_stands(world):
    """Placeholders are resolved in the user's properties alone."""
    world.install("user", "product=${rcp.home}/p", "osgi.splashPath=${rcp.home}/s")
    world.base_properties("application=${rcp.home}/a")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + ["-application", "/mnt/app/a", "-product", "${rcp.home}/p"] + STARTUP + system()[:2]
        + ["-Dosgi.splashPath=${rcp.home}/s"] + system()[2:] + INSTALL_AREA)


def test_in_debug_mode_errors_are_not_suppressed(world):
    """The word itself is the platform's too."""
    world.install()
    world.run("-debug")
    assert world.only_platform().argv == HEAD[:1] + ["-debug"] + areas() + TAIL


def test_another_archive_to_start_from(world):
    """The option and its value stay among the user's words."""
    world.install()
    world.run("-perfJar", "/tmp/p.jar")
    assert world.only_platform().argv == (
        HEAD + ["-perfJar", "/tmp/p.jar"] + areas() + ["-startup", "/tmp/p.jar", "-vmargs"] + system() + INSTALL_AREA)


def test_another_archive_that_is_not_named(world):
    world.install()
    world.run("-perfJar")
    assert world.only_platform().argv == HEAD + ["-perfJar"] + areas() + TAIL


def test_system_properties_of_both_files_stand_in_their_order(world):
    """The user's copy was read before the JVM's file; equal keys are all passed on."""
    world.install()
    world.base_properties("-Dz=1", "-Da=2", "-Dz=3")
    world.jvm_properties("-Da=4", "-D=5", "-Dempty")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + system() + ["-Dz=1", "-Da=2", "-Dz=3", "-Da=4", "-D=5", "-Dempty="] + INSTALL_AREA)


def test_each_system_property_of_the_installation_is_traced(world):
    world.install()
    world.base_properties("-Dfoo=bar", "-Dx=")
    world.run("-debug")
    log = read(user_logs()[0])
    assert [line for line in log.splitlines() if "QVMRL0075I" in line] == [
        'QVMRL0075I: commandArg  = "-Dfoo=bar"', 'QVMRL0075I: commandArg  = "-Dx="']


def test_properties_of_other_kinds_yield_no_words(world):
    """"-D" and "-X" count at the beginning of a key alone, in the very case."""
    world.install("user", "-Dlauncher=1", "-Xlauncher", "cp=/launcher")
    world.base_properties("x-Da=1", "-da=2", "-xa", "D=3", "Xbootclasspath=/b", "CP=/c")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + TAIL


def test_standard_placeholders_in_the_users_words(world):
    """Replaced everywhere on the line, all of them; those that look into properties or the environment are not."""
    world.install()
    world.base_properties("p=1")
    world.run("${rcp.home}:${workspace.location}:${rcp.data}:${rcp.home}", "${prop.p}", "${env.HOME}", "-vmargs",
              "-Dx=${rcp.home}/x")
    assert world.only_platform().argv == (
        HEAD + ["/mnt/app:%s:%s:/mnt/app" % (WORKSPACE, WORKSPACE), "${prop.p}", "${env.HOME}"]
        + areas() + STARTUP + ["-Dx=/mnt/app/x"] + system() + INSTALL_AREA)


def test_words_travel_on_byte_for_byte(world):
    """Text outside of ASCII and beyond 16 bits, blanks, an empty word, backslashes, a tab."""
    world.install()
    words = ["ä€\U0001f600", "a b", "", "C:\\x\\", "\t", "'", "$(x)", "*", "line\nend"]
    world.run(*words)
    assert world.only_platform().raw_argv == [word.encode() for word in HEAD + words + areas() + TAIL]


def test_a_thousand_words(world):
    world.install()
    words = ["-w%d" % number for number in range(1000)]
    world.run(*words)
    assert world.only_platform().argv == HEAD + words + areas() + TAIL


@pytest.mark.parametrize("word", ["%20n%s%n", "100%%", "%", "%5", "%ls%hn", "%n" * 40])
def test_words_that_look_like_formats_travel_on_unchanged(world, word):
    """A link in a browser may hold them; nothing is read or written for them."""
    world.install()
    world.run(word, "vmarg.a=-Da=" + word)
    assert world.only_platform().argv == (
        HEAD + [word] + areas() + STARTUP + ["-Da=" + word] + system() + INSTALL_AREA)


def test_options_without_effect_travel_on(world):
    """They are known words, but nothing in the start looks at them."""
    world.install()
    words = ["-dcommand_only", "-initMUService", "-noExit", "-consoleLog", "-pb4l", "-debugFile", "-nl", "de", "-dir",
             "rtl", "-provManifest", "-initialCompleteFlag"]
    world.run(*words)
    assert world.only_platform().argv == HEAD + words + areas() + TAIL
