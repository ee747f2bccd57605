"""The diagnostic marker file: a start that finds it has words of its own, and waits until somebody deletes it."""

import os
import time

import pytest

from world import (APP, ECLIPSE, HOME, INSTALL_AREA, LAUNCHER, STARTUP, TEMP_LOG, WORKSPACE, areas, lines, read, system,
                   until, user_logs)

MARKER = APP + "/rcp/prov.debug/debug.txt"
WORDS = ["-debugFile", "-pb4l", "-debug", "-console"]


def waiting(world, *words):
    """A start that has opened its log and now waits for the marker to be deleted."""
    start = world.start(*words)
    until(lambda: user_logs() and read(user_logs()[0]), "the log is open")
    assert start.running() and world.platforms() == []
    return start


def started(world, *words):
    """The command of a start for which the marker is deleted."""
    world.write(MARKER)
    start = waiting(world, *words)
    os.unlink(MARKER)
    start.wait(5)
    assert start.status == 0
    return world.only_platform().argv


def command(*platform, jvm=()):
    return [ECLIPSE, *platform] + areas() + STARTUP + list(jvm) + system() + INSTALL_AREA


def test_the_words_of_a_start_with_the_marker(world):
    """They stand right behind the program, in front of the user's own."""
    world.install()
    assert started(world, "-foo") == command(*WORDS, "-foo")


@pytest.mark.parametrize("own, left", [
    (["-debug"], []),
    (["-x", "-console", "-debug", "-pb4l", "-y"], ["-x", "-y"]),
    (["-debug", "-debug", "-console", "-console"], ["-debug", "-console"]),
    (["-debugFile"], ["-debugFile"]),
    (["-debug2", "-Console"], ["-debug2", "-Console"]),
])
def test_the_users_own_words_are_removed(world, own, left):
    """The second of each goes; a third stays, and so does a second "-debugFile"."""
    world.install()
    assert started(world, *own) == command(*WORDS, *left)


def test_the_platform_is_waited_for(world):
    """The console is in its command, and there is no fix for a missing one."""
    world.install()
    world.base_properties("vmfix.noconsole=-Dfix")
    world.plan("wait")
    world.write(MARKER)
    start = waiting(world)
    os.unlink(MARKER)
    platform = world.platform()
    assert platform.argv == command(*WORDS)
    assert start.running()
    platform.end()
    assert start.wait(5).status == 0


def test_tracing_is_on(world):
    """The log has a name of its own, and holds the lines of the trace."""
    world.install()
    started(world)
    (log,) = user_logs()
    assert os.path.basename(log).startswith("velmora_")
    assert 'QVMRL0023I:   attrib = "rcp.install.id"\n' in read(log)


def test_the_start_waits_a_second_at_a_time(world):
    """However long; it looks for the first time after the log has been opened."""
    world.install()
    world.write(MARKER)
    start = waiting(world)
    began = time.monotonic()
    until(lambda: time.monotonic() - began > 1.5, "the first second is over")
    assert start.running() and world.platforms() == []
    os.unlink(MARKER)
    start.wait(5)
    assert time.monotonic() - began < 3.5
    assert start.status == 0


def test_the_log_in_tmp_is_cleared_away_before(world):
    """As soon as the log is open, and not only after the wait."""
    world.install()
    world.write(TEMP_LOG, "earlier trouble\n")
    world.write(MARKER)
    start = waiting(world)
    until(lambda: not os.path.exists(TEMP_LOG), "the log in /tmp is cleared away")
    assert start.running() and world.platforms() == []
    os.unlink(MARKER)
    assert start.wait(5).status == 0


def test_nothing_of_the_configuration_is_made_before(world):
    """The workspace, the lock and the log alone."""
    world.install()
    world.write(MARKER)
    start = waiting(world)
    assert sorted(os.listdir(WORKSPACE)) == [".rcp.lock", "logs"]
    os.unlink(MARKER)
    assert start.wait(5).status == 0


def test_the_word_for_an_extension_at_the_end_counts_as_absent(world):
    world.install()
    assert started(world, "-config") == command(*WORDS, "-config")


def test_on_a_restart_two_of_the_words_vanish(world):
    """Tracing stays off, and the platform is not waited for."""
    world.install()
    assert started(world, "-restart") == [
        ECLIPSE, "--launcher.suppressErrors", "-debugFile", "-pb4l"] + areas() + STARTUP + system() + INSTALL_AREA
    assert [os.path.basename(path) for path in user_logs()] == ["velmora.log"]


def test_with_an_extension_it_is_not_looked_for(world):
    """The start neither has the words nor waits."""
    world.install("user", "config.a.1=-x")
    world.write(MARKER)
    assert world.run("-config", "a").status == 0
    assert world.only_platform().argv == command("--launcher.suppressErrors", "-x")
    assert os.path.exists(MARKER)


INITIAL = ["config.initial.1=-application", "config.initial.2=org.init", "config.initial.3=-initialCompleteFlag",
           "config.initial.4=done"]


def test_an_initial_run_has_the_words_when_the_marker_was_found(world):
    """It does not look again: by then the file has been deleted."""
    world.install("user", *INITIAL)
    assert started(world, "-foo", "-debug") == command(
        *WORDS, "-application", "org.init", "-initialCompleteFlag", "done")


def test_an_initial_run_of_a_start_with_an_extension_has_no_such_words(world):
    """Nobody has looked, although the file is there."""
    world.install("user", *INITIAL)
    world.write(MARKER)
    assert world.run("-config", "a").status == 0
    assert world.only_platform().argv == command(
        "--launcher.suppressErrors", "-application", "org.init", "-initialCompleteFlag", "done")


@pytest.mark.parametrize("how", ["unreadable", "elsewhere", "a dangling link"])
def test_a_marker_that_does_not_count(world, how):
    world.install()
    if how == "unreadable":
        world.write(MARKER, "", 0o000)
    elif how == "elsewhere":
        world.write(HOME + "/rcp/prov.debug/debug.txt")
        world.write(APP + "/prov.debug/debug.txt")
    else:
        world.link(MARKER, "/mnt/nowhere")
    assert world.run().status == 0
    assert world.only_platform().argv == command("--launcher.suppressErrors")


def test_a_folder_counts_as_a_marker(world):
    world.install()
    world.folder(MARKER)
    start = waiting(world)
    os.rmdir(MARKER)
    assert start.wait(5).status == 0
    assert world.only_platform().argv == command(*WORDS)


def test_the_marker_is_not_recorded(world):
    """The words of the start are those of its line."""
    world.install()
    started(world, "-foo")
    assert read(WORKSPACE + "/.config/args.properties") == lines(
        "arg0=" + LAUNCHER, "arg1=-foo", "argc=2", "com.vantor.rcp.core.internal.librarypath=")
