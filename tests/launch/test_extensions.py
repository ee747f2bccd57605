"""Configuration extensions: "-config" and a name add the words that the installation keeps under that name."""

import pytest

from world import CONFIG, HEAD, INSTALL_AREA, LAUNCHER, STARTUP, WORKSPACE, areas, lines, read, system

OPTIONS_WITH_A_VALUE = ["-vm", "-data", "-plugincustomization", "-application", "-product", "-personality", "-nl",
                        "-dir"]


def extension(*words, name="a"):
    """The lines of velmora.properties for these words, numbered from 1."""
    return ["config.%s.%d=%s" % (name, number, word) for number, word in enumerate(words, 1)]


def command(*platform, jvm=(), workspace=WORKSPACE, more=()):
    """The command with these words for the platform and for the JVM."""
    return (HEAD + list(platform) + areas(workspace) + list(more) + STARTUP + list(jvm) + system(workspace)
            + INSTALL_AREA)


def started(world, *words, **how):
    start = world.run(*words, **how)
    assert start.status == 0
    return world.only_platform().argv


SIX = ["-one", "-two", "-three", "-four", "-five", "-six"]


@pytest.mark.parametrize("split", range(7))
def test_six_words_around_the_word_vmargs(world, split):
    """Words before "-vmargs" are the platform's and stand, in their own order, just before the line's own "-vmargs";
    words after it are the JVM's and stand after the line's own JVM words."""
    world.install("user", *extension(*SIX[:split], "-vmargs", *SIX[split:]))
    assert started(world, "-first", "-config", "a", "-vmargs", "-Xmx1g", "-Xmine") == command(
        "-first", *SIX[:split], jvm=["-Xmx1g", "-Xmine", *SIX[split:]])


@pytest.mark.parametrize("split", range(7))
def test_six_words_around_the_word_vmargs_when_the_line_has_none(world, split):
    """Then all words go to the end, the extension's "-vmargs" among them."""
    world.install("user", *extension(*SIX[:split], "-vmargs", *SIX[split:]))
    assert started(world, "-first", "-config", "a", "-last") == command(
        "-first", "-last", *SIX[:split], jvm=SIX[split:])


def test_an_extension_with_words_for_both_sides(world):
    """A line with "-vmargs -Xmx1g" and an extension of "-nosplash", "-vmargs", "-Xss2m" give "-nosplash", "-vmargs",
    "-Xmx1g", "-Xss2m"."""
    world.install("user", *extension("-nosplash", "-vmargs", "-Xss2m"))
    assert started(world, "-config", "a", "-vmargs", "-Xmx1g") == command("-nosplash", jvm=["-Xmx1g", "-Xss2m"])


def test_a_second_vmargs_word_of_an_extension_is_dropped_like_the_first(world):
    """When the line has one of its own; else both are words like any other."""
    world.install("user", *extension("-p", "-vmargs", "-j", "-vmargs", "-k"))
    assert started(world, "-config", "a", "-vmargs", "-x") == command("-p", jvm=["-x", "-j", "-k"])


def test_a_second_vmargs_word_of_an_extension_when_the_line_has_none(world):
    world.install("user", *extension("-p", "-vmargs", "-j", "-vmargs", "-k"))
    assert started(world, "-config", "a") == command("-p", jvm=["-j", "-vmargs", "-k"])


def test_the_numbers_have_no_gap(world):
    """The first missing number ends the list."""
    world.install("user", "config.a.1=-one", "config.a.2=-two", "config.a.4=-four")
    assert started(world, "-config", "a") == command("-one", "-two")


def test_the_numbers_begin_with_one(world):
    world.install("user", "config.a.0=-zero", "config.a.2=-two")
    assert started(world, "-config", "a") == command()


def test_the_order_in_the_file_does_not_matter(world):
    """More than nine words are numbers like any other."""
    words = ["-w%d" % number for number in range(1, 13)]
    world.install("user", *reversed(extension(*words)))
    assert started(world, "-config", "a") == command(*words)


def test_an_empty_word_is_skipped(world):
    """An empty first word does not end the list: the second is taken."""
    world.install("user", "config.a.1=", "config.a.2=-nosplash", "config.a.3", "config.a.4=-x")
    assert started(world, "-config", "a") == command("-nosplash", "-x")


def test_only_the_named_extension_is_merged(world):
    world.install("user", *extension("-of-a"), *extension("-of-b", name="b"), *extension("-of-ab", name="ab"))
    assert started(world, "-config", "b") == command("-of-b")


def test_an_unknown_extension_merges_nothing(world):
    """The word and the name go all the same, and second options are dropped as with any other."""
    world.install("user", *extension("-of-a"))
    assert started(world, "-nl", "de", "-config", "none", "-nl", "fr") == command("-nl", "de", "fr")


def test_the_word_at_the_end_counts_as_absent(world):
    """No name follows it: it stays among the words, and nothing is dropped."""
    world.install("user", *extension("-of-a"), "config..1=-of-nothing")
    assert started(world, "-nl", "de", "-nl", "fr", "-config") == command("-nl", "de", "-nl", "fr", "-config")


def test_the_first_of_two_names_counts(world):
    """The second stays among the words with its name."""
    world.install("user", *extension("-of-a"), *extension("-of-b", name="b"))
    assert started(world, "-config", "a", "-config", "b") == command("-config", "b", "-of-a")


def test_the_name_may_be_any_word(world):
    """Even the program's own "-vmargs", which then divides nothing."""
    world.install("user", "config.-vmargs.1=-odd")
    assert started(world, "-config", "-vmargs", "-x") == command("-x", "-odd")


def test_the_name_may_be_a_named_argument(world):
    """The word as it was received is the name, and it is a named argument as well."""
    world.install("user", *extension("-of-x", name="x"))
    assert started(world, "-config", "vmarg.a=-A", "x") == command("x", jvm=["-A"])


def test_a_named_argument_behind_config_keeps_it_from_being_last(world):
    """So the marker file is not looked for."""
    world.install("user")
    world.write("/mnt/app/rcp/prov.debug/debug.txt", "")
    assert started(world, "-config", "vmarg.a=-A") == command(jvm=["-A"])


# ---- named JVM arguments

def test_named_jvm_arguments_of_the_line_win(world):
    """The line's "vmarg.Xmx" keeps its value, the extension's adds the names that were not there yet; neither is a
    word for the platform."""
    world.install("user", *extension("vmarg.Xmx=-Xmx2g", "-x", "vmarg.Xss=-Xss2m"))
    assert started(world, "vmarg.Xmx=-Xmx1g", "-config", "a") == command("-x", jvm=["-Xmx1g", "-Xss2m"])


def test_named_jvm_arguments_on_both_sides_of_vmargs(world):
    """They are named arguments wherever they stand, and they count as words for the place of insertion."""
    world.install("user", *extension("vmarg.c=-C", "-x", "-vmargs", "vmarg.d=-D4", "-X5"))
    assert started(world, "vmarg.a=-A", "-y", "-config", "a", "-vmargs", "vmarg.b=-B", "-X6") == command(
        "-y", "-x", jvm=["-X6", "-X5", "-A", "-B", "-C", "-D4"])


def test_an_empty_named_argument_of_the_line_cancels_the_extensions(world):
    world.install("user", *extension("vmarg.Xmx=-Xmx2g"))
    assert started(world, "-config", "a", "vmarg.Xmx=") == command()


# ---- the place of insertion

def test_the_last_vmargs_of_the_line_is_the_place(world):
    """The extension's platform words stand before it, behind an earlier "-vmargs"."""
    world.install("user", *extension("-one", "-vmargs", "-two"))
    assert started(world, "-config", "a", "-vmargs", "-A", "-vmargs", "-B") == command(
        jvm=["-A", "-one", "-vmargs", "-B", "-two"])


def test_the_place_is_two_too_early_when_the_name_stands_after_vmargs(world):
    """Two are taken off its number for "-config" and the name, whether or not they stand before it."""
    world.install("user", *extension("-one", "-two"))
    assert started(world, "-x", "-y", "-vmargs", "-J", "-config", "a") == command("-one", "-two", "-x", "-y",
                                                                                jvm=["-J"])


@pytest.mark.parametrize("before", [[], ["-x"]])
def test_there_is_no_place_before_the_first_word(world, before):
    """With "-vmargs" as the first or second word the place is the very front: the extension's words push the program's
    path among the platform's words."""
    world.install("user", *extension("-one", "-two"))
    assert started(world, *before, "-vmargs", "-J", "-config", "a") == command(
        "-two", LAUNCHER, *before, jvm=["-J"])


# ---- second options

def test_the_option_of_the_line_wins_and_the_extensions_value_stays(world):
    """The line's "-data X" with the extension's "-data", "Y": the extension's option is dropped, its value stays."""
    world.install("user", *extension("-data", "Y"))
    assert started(world, "-config", "a", "-data", "/mnt/x") == command("Y", workspace="/mnt/x")


@pytest.mark.parametrize("option", OPTIONS_WITH_A_VALUE)
def test_the_second_of_each_option_with_a_value_is_dropped(world, option):
    """The option's word alone; its value becomes a word of its own."""
    world.install("user", *extension(option, "/mnt/b"))
    argv = started(world, option, "/mnt/a", "-config", "a")
    if option == "-data":
        assert argv == command("/mnt/b", workspace="/mnt/a")
    elif option == "-vm":
        # Behind the options of the platform stands the launcher's own pair.
        assert argv == command("/mnt/b", more=["-vm", "/mnt/a"])
    else:
        assert argv == command(option, "/mnt/a", "/mnt/b")


@pytest.mark.parametrize("option, words", [
    ("-nl", ["-nl", "A", "B", "-nl", "C"]),
    ("-product", ["-product", "A", "B", "C"]),
])
def test_a_third_option_stays_but_for_the_product(world, option, words):
    """Each option loses one occurrence; "-product" is looked at twice."""
    world.install("user", *extension(option, "B", option, "C"))
    assert started(world, option, "A", "-config", "a") == command(*words)


@pytest.mark.parametrize("option", ["-console", "-debug", "-pb4l"])
def test_the_second_of_each_single_word_is_dropped(world, option):
    world.install("user", *extension(option, option))
    argv = started(world, option, "-config", "a")
    expected = command(option, option)
    if option == "-debug":
        expected.remove("--launcher.suppressErrors")
    assert argv == expected


def test_other_words_may_come_twice(world):
    world.install("user", *extension("-foo", "-foo", "-debugFile"))
    assert started(world, "-foo", "-debugFile", "-config", "a") == command(
        "-foo", "-debugFile", "-foo", "-foo", "-debugFile")


def test_options_of_an_extension_count_like_those_of_the_line(world):
    """The tracing, the VM and the workspace that it names."""
    world.install("user", *extension("-debug", "-vm", "/opt/java", "-data", "/mnt/w/"))
    argv = started(world, "-config", "a")
    expected = command("-debug", workspace="/mnt/w", more=["-vm", "/opt/java"])
    expected.remove("--launcher.suppressErrors")
    assert argv == expected


# ---- the workspace that an extension names

def at_the_front(world, *more):
    """The extension's "-data" and its value become the words 0 and 1, where no option is looked for."""
    world.install("user", *extension("-data", "/mnt/w"), *more)
    return started(world, "-vmargs", "-config", "a")


def test_an_extensions_workspace_replaces_the_installations(world):
    """The property takes the value, also where the option itself is not found."""
    assert at_the_front(world, "rcp.data=/mnt/r") == command("/mnt/w", LAUNCHER, workspace="/mnt/w")


def test_an_extensions_workspace_without_the_property_changes_nothing(world):
    """A "rcp.data" is not added."""
    assert at_the_front(world) == command("/mnt/w", LAUNCHER)


def test_a_value_that_reads_like_the_property_is_taken_for_it(world):
    """Keys and values are walked alike, so what follows the value, a key, is overwritten."""
    world.install("user", "x=rcp.data", "product=org.prod", "osgi.splashPath=s")
    expected = command(workspace="/mnt/w")
    expected.insert(expected.index("-Drcp.data=/mnt/w") + 1, "-Dosgi.splashPath=s")
    assert started(world, "-config", "none", "-data", "/mnt/w") == expected


def test_without_an_extension_the_properties_stay(world):
    world.install("user", "x=rcp.data", "product=org.prod")
    assert started(world, "-data", "/mnt/w") == command(workspace="/mnt/w", more=["-product", "org.prod"])


def test_an_option_without_a_value_names_no_workspace(world):
    """As the last word it is as if it were not there."""
    world.install("user", "x=rcp.data", "product=org.prod", "rcp.data=/mnt/r")
    assert started(world, "-config", "none", "-data") == command(workspace="/mnt/r", more=["-product", "org.prod"])


# ---- the executable for a restart

def recorded_program(world, *words):
    """What is recorded as the program of a restart."""
    assert world.run(*words).status == 0
    return read(CONFIG + "/args.properties").splitlines()[0]


@pytest.mark.parametrize("value, program", [
    ("/opt/bin/restart", "/opt/bin/restart"),
    ("${rcp.home}/bin/restart", "/mnt/app/bin/restart"),
    ("${rcp.home}/${rcp.home}", "/mnt/app/${rcp.home}"),
    ("bin\\\\restart", "bin/restart"),
])
def test_the_restart_executable_of_an_extension(world, value, program):
    """Its first placeholder for the installation is replaced, and its separators are turned."""
    world.install("user", "config.a.restartExe.linux=" + value)
    assert recorded_program(world, "-config", "a") == "arg0=" + program


@pytest.mark.parametrize("properties, words", [
    (["config.a.restartExe.linux="], ["-config", "a"]),
    (["config.a.restartExe.win32=/x", "config.a.restartExe=/x"], ["-config", "a"]),
    (["config.b.restartExe.linux=/x"], ["-config", "a"]),
    (["config.a.restartExe.linux=/x"], ["a", "-config"]),
    (["config.a.restartExe.linux=/x"], ["a"]),
])
def test_without_a_restart_executable_the_launcher_is_recorded(world, properties, words):
    """An empty one, one of another system or another name, and a "-config" without a name."""
    world.install("user", *properties)
    assert recorded_program(world, *words) == "arg0=" + LAUNCHER


def test_the_line_is_recorded_as_it_was(world):
    """With "-config" and its name, without the words that were merged."""
    world.install("user", *extension("-x", "-y"))
    world.run("-first", "-config", "a", "-vmargs", "-J")
    assert read(CONFIG + "/args.properties") == lines(
        "arg0=" + LAUNCHER, "arg1=-first", "arg2=-config", "arg3=a", "arg4=-vmargs", "arg5=-J", "argc=6",
        "com.vantor.rcp.core.internal.librarypath=")


def test_the_words_of_an_extension_are_no_properties_of_the_platform(world):
    """The installation's words under a name reach only a start that names them."""
    world.install("user", *extension("-x"))
    assert started(world) == command()
