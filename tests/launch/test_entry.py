"""The first steps: the locale, the version, the line with the arguments, what a restart leaves out."""

import os
import signal

import pytest

from world import (CONFIG, HEAD, HOME, INSTALL_AREA, JAVA, LAUNCHER, LOCK, LOG, STARTUP, TEMP_LOG, areas, read, system,
                   temp_logs, tree, user_logs)

TAIL = STARTUP + system() + INSTALL_AREA
FIRST = 'QVMRL0030I: velmora main arguments="'


@pytest.mark.parametrize("env", [
    {"LC_ALL": "xx_YY.nowhere"},
    {"LC_ALL": None, "LC_CTYPE": "xx_YY.nowhere", "LANG": "C.UTF-8"},
    {"LC_ALL": None, "LANG": "xx_YY.nowhere"},
])
def test_a_locale_that_does_not_exist(world, env):
    """The start ends before even its arguments are logged, and nothing is made."""
    world.install()
    start = world.run("-version", env=env)
    world.fatal(start, "QVMRL0182E: Set locale error!")
    assert read(TEMP_LOG).startswith("QVMRL0182E: ")
    assert tree(HOME) == []


@pytest.mark.parametrize("env", [
    {"LC_ALL": "C"},
    {"LC_ALL": "POSIX"},
    {"LC_ALL": "C.UTF-8"},
    {"LC_ALL": None},
    {"LC_ALL": "", "LANG": "C.UTF-8"},
    {"LC_ALL": None, "LC_CTYPE": "C.UTF-8", "LANG": "xx_YY.nowhere", "LC_MESSAGES": "xx_YY.nowhere"},
])
def test_locales_that_exist(world, env):
    """Only the character type counts."""
    world.install()
    assert world.run(env=env).status == 0
    assert world.only_platform().argv == HEAD + areas() + TAIL


def test_the_version_is_told_in_the_log(world):
    """Without any installation; three blanks, and the end of a fatal error."""
    world.launcher("/mnt/velmora")
    start = world.run("-version", program="/mnt/velmora")
    world.fatal(start, 'QVMRL0031I:   version = "20131002.1404"')
    assert read(TEMP_LOG).startswith(FIRST + '/mnt/velmora, -version, "\n\nQVMRL0031I:   version = "20131002.1404" : ')
    assert temp_logs() == [TEMP_LOG]


@pytest.mark.parametrize("words", [["-version", "-foo"], ["-foo", "-version"], ["-Version"], ["-version", "-version"]])
def test_the_version_beside_another_word_is_a_word(world, words):
    world.install()
    assert world.run(*words).status == 0
    assert world.only_platform().argv == HEAD + words + areas() + TAIL


# ---- the line with the arguments

@pytest.mark.parametrize("words, shown", [
    ([], LAUNCHER + ", "),
    (["-a", "b c", ""], LAUNCHER + ", -a, b c, , "),
    (["ä€\U0001f600"], LAUNCHER + ", ä€\U0001f600, "),
    (["100%%", "%d"], LAUNCHER + ", 100%, , "),
    (["%20n%s%n"], LAUNCHER + ", , "),
    (["50% done"], LAUNCHER + ", 50one, "),
    (["%y", "%", "%5", "%-08.3lld|", "%hhn%Lf%zu%jd%td%C%S%p%m|"], LAUNCHER + ", %y, %, %5, |, |, "),
    (["%%n", "%%%n", "%%%%"], LAUNCHER + ", %n, %, %%, "),
    (["%k%d", "%#x%+i"], LAUNCHER + ", %k, , "),
])
def test_the_arguments_are_one_entry_and_its_own_format(world, words, shown):
    """Two percent signs are one; a conversion has no argument and gives nothing; anything else stays. The line end of
    the entry is followed by that of the line."""
    world.install()
    assert world.run(*words).status == 0
    assert world.log().startswith(FIRST + shown + '"\n\nQVMRL0303I: ')


def test_the_name_by_which_the_launcher_was_called(world):
    world.install()
    world.run("-a", argv0="whatever")
    assert world.log().startswith(FIRST + 'whatever, -a, "\n\n')
    assert world.only_platform().argv == HEAD + ["-a"] + areas() + TAIL


def test_a_word_that_is_no_text_is_empty(world):
    """In the log and in the command."""
    world.install()
    world.run("-a", "\udcff", "-b")
    assert world.log().startswith(FIRST + LAUNCHER + ', -a, , -b, "\n\n')
    assert world.only_platform().argv == HEAD + ["-a", "", "-b"] + areas() + TAIL


def test_in_the_c_locale_only_ascii_is_text(world):
    world.install()
    world.run("-a", "ä", "~", env={"LC_ALL": "C"})
    assert world.only_platform().argv == HEAD + ["-a", "", "~"] + areas() + TAIL


@pytest.mark.parametrize("length", [4094, 4095, 4096, 9000])
def test_a_line_is_cut_at_4095_bytes(world, length):
    """The entry's own line end is the last of them; without it no empty line follows."""
    text = lambda word: FIRST + LAUNCHER + ", " + word + ', "\n'
    word = "x" * (length - len(text("")))
    world.install()
    world.run(word)
    assert world.log().startswith(text(word)[:4095] + "\nQVMRL0303I: ")
    assert word in world.only_platform().argv


def test_parameters_of_any_length_are_logged_up_to_the_line(world):
    """They are the argument of a format, which alone is held against its limit of 999 characters."""
    world.install()
    words = ["a" * 999, "b" * 1000, "c" * 4095, "d" * 4096, "%d%%"]
    world.run(*words)
    log = world.log().splitlines()
    begin = log.index("QVMRL0132I: ===== Begin Launch Parameters =====")
    assert log[begin + 1:begin + 8] == HEAD + ["a" * 999, "b" * 1000, "c" * 4095, "d" * 4095, "%d%%"]


# ---- a restart leaves words out

def test_on_a_restart_two_words_never_reach_the_command(world):
    """Wherever they come from: the line, the JVM's words, a named argument, a default. Longer words do."""
    world.install("user", "product=-debug")
    world.base_properties("application=-console")
    world.run("-restart", "-debug", "-console", "-debugger", "-consoleLog", "-x", "vmarg.a=-debug", "-vmargs",
              "-console", "-debug", "-Xa")
    assert world.only_platform().argv == (
        HEAD + ["-debugger", "-consoleLog", "-x"] + areas() + ["-application", "-product"] + STARTUP + ["-Xa"]
        + system() + INSTALL_AREA)


def test_a_restart_is_never_traced(world):
    world.install()
    world.run("-debug", "-restart")
    assert user_logs() == [LOG]
    assert "QVMRL0032I" not in world.log()
    assert world.only_platform().argv == HEAD + areas() + TAIL


def test_the_restart_word_counts_after_vmargs_too(world):
    """There it stays a word of the JVM; a repeat of it stays a word of the platform."""
    world.install()
    world.run("-debug", "-restart", "-restart", "-vmargs", "-restart")
    assert world.only_platform().argv == (
        HEAD + ["-restart"] + areas() + STARTUP + ["-restart"] + system() + INSTALL_AREA)
    assert not os.path.exists(CONFIG + "/args.properties")


def test_the_restart_word_as_the_launchers_name(world):
    """For the words that are left out the whole vector counts, its first word included; nothing else looks at that."""
    world.install()
    start = world.run("-debug", "-x", argv0="-restart")
    assert start.seconds < 1
    assert world.only_platform().argv == HEAD[:1] + ["-x"] + areas() + TAIL
    assert os.path.exists(CONFIG + "/args.properties")


def test_what_the_platform_inherits(world):
    """The folder and the umask are nobody's business, signals are as they were, and of the launcher's files only the
    lock reaches the platform."""
    world.install()
    world.folder("/mnt/deep/er")
    world.run(cwd="/mnt/deep/er", umask=0o027)
    platform = world.only_platform()
    assert (platform.cwd, platform.umask) == ("/mnt/deep/er", 0o027)
    mine = dict(line.split(":\t") for line in read("/proc/self/status").splitlines())
    restored = 1 << signal.SIGPIPE - 1 | 1 << signal.SIGXFSZ - 1  # by the test, for what it starts
    reserved = 1 << 32 - 1 | 1 << 33 - 1  # the C library's own
    assert platform.status["SigBlk"] == mine["SigBlk"]
    assert int(platform.status["SigIgn"], 16) & ~reserved == int(mine["SigIgn"], 16) & ~restored & ~reserved
    others = {number: target for number, target in platform.descriptors.items() if number > 2}
    assert list(others.values()) == [LOCK]
    assert platform.descriptors[0] == "/dev/null"


@pytest.mark.parametrize("closed", [[0], [1], [2], [0, 1], [0, 2], [1, 2], [0, 1, 2]])
def test_closed_descriptors_of_a_later_start(world, closed):
    """There the lock file is not made, only opened."""
    world.install()
    assert world.run().status == 0
    world.all_ended()
    assert world.run(closed=closed).status == 0
    platform = world.platform(1)
    assert {platform.descriptors[number] for number in closed} == {"/dev/null"}
    assert [number for number, target in platform.descriptors.items() if target == LOCK and number < 3] == []
    assert read(LOCK) == "%d          " % platform.pid


@pytest.mark.parametrize("closed", [[0], [1], [2], [0, 1], [0, 2], [1, 2], [0, 1, 2]])
def test_closed_descriptors(world, closed):
    """What the launcher opens may take their numbers; nothing is written to the wrong file, and what stays open does
    not take one: the platform inherits empty ones."""
    world.install("user", "jvm.location=" + JAVA)
    assert world.run("-foo", closed=closed).status == 0
    platform = world.only_platform()
    assert platform.argv == HEAD + ["-foo"] + areas() + ["-vm", JAVA] + TAIL
    assert {platform.descriptors[number] for number in closed} == {"/dev/null"}
    assert [number for number, target in platform.descriptors.items() if target == LOCK and number < 3] == []
    assert read(LOCK) == "%d          " % platform.pid
    assert read(CONFIG + "/config.ini") == "osgi.bundles=a, b\n"
    assert world.log().startswith(FIRST + LAUNCHER + ', -foo, "\n\nQVMRL0303I: lock file captured @ <time>\n')
    assert world.log().endswith("\nQVMRL0306I: lock file released @ <time>\n")


def test_the_executable_is_found_through_a_link(world):
    """The installation is where the file itself lies."""
    world.install()
    world.link("/mnt/bin/start", LAUNCHER)
    world.run(program="/mnt/bin/start")
    assert world.only_platform().argv == HEAD + areas() + TAIL
