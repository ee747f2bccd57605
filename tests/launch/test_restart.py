"""A restart by the platform: the old platform is waited for, 20 seconds at most."""

import os

import pytest

from world import (CONFIG, ECLIPSE, HEAD, INSTALL_AREA, LOCK, MAIN, STARTUP, areas, lines, read, system, until)

EXPIRED = ("QVMRL0013E: Existing platform has not shutdown within allotted time. Invalidating the lockfile for new "
           "launch.\n")
LOOK = "QVMRL0090E: Existing platform lock file found - checking validity.\n"
MAIN_ARGV = HEAD + areas() + STARTUP + system() + INSTALL_AREA


def daemon_argv(pid):
    return HEAD + areas() + ["-useDaemon", str(pid)] + STARTUP + system() + INSTALL_AREA


def lock(pid):
    return "%d          " % pid


def test_without_an_old_platform_a_restart_waits_a_second(world):
    """And does not record its words."""
    world.install()
    start = world.run("-restart", "-rcp_old_pid", "99999")
    assert 0.9 < start.seconds < 4
    assert world.only_platform().argv == MAIN_ARGV
    assert not os.path.exists(CONFIG + "/args.properties")
    assert os.path.exists(CONFIG + "/config.ini")


def test_a_restart_waits_until_the_old_platform_has_ended(world):
    """Then it is the main process; nothing is told of it."""
    world.install()
    old = world.holder(ECLIPSE)
    world.write(LOCK, lock(old.pid))
    start = world.start("-restart", "-rcp_old_pid", str(old.pid))
    until(lambda: start.age() > 1.6, "the old platform has been looked at")
    assert start.running() and world.platforms() == []
    world.end(old)
    start.wait(10)
    platform = world.only_platform()
    assert 1.6 < start.seconds < 6
    assert platform.argv == MAIN_ARGV
    assert read(LOCK) == lock(platform.pid)
    assert EXPIRED not in world.log()
    assert "QVMRL0304I: We are main process\n" in world.log()


def test_a_restart_beside_another_platform_does_not_wait(world):
    """The lock file names another one than that which asked for the restart."""
    world.install()
    other = world.holder(ECLIPSE)
    world.write(LOCK, lock(other.pid))
    start = world.run("-restart", "-rcp_old_pid", "99999")
    assert 0.9 < start.seconds < 4
    assert world.only_platform().argv == daemon_argv(other.pid)
    assert read(LOCK) == lock(other.pid)


@pytest.mark.parametrize("words", [["-restart"], ["-restart", "-rcp_old_pid"], ["-rcp_old_pid", "x", "-restart"]])
def test_a_restart_that_does_not_say_who_asked_does_not_wait(world, words):
    world.install()
    other = world.holder(ECLIPSE)
    world.write(LOCK, lock(other.pid))
    start = world.run(*words)
    assert 0.9 < start.seconds < 4
    assert world.only_platform().argv == daemon_argv(other.pid)


def test_a_restart_stops_waiting_when_another_platform_takes_over(world):
    """Each look sees the lock file as it is then."""
    world.install()
    old, new = world.holder(ECLIPSE), world.holder(ECLIPSE)
    world.write(LOCK, lock(old.pid))
    start = world.start("-restart", "-rcp_old_pid", str(old.pid))
    until(lambda: start.age() > 1.6, "the old platform has been looked at")
    assert start.running()
    with open(LOCK, "r+") as file:
        file.write(lock(new.pid))
    start.wait(10)
    assert start.seconds < 6
    assert world.only_platform().argv == daemon_argv(new.pid)
    assert EXPIRED not in world.log()


def test_a_restart_beside_a_stranger_does_not_wait(world):
    """The number of the old platform lives on in another program."""
    world.install()
    stranger = world.holder("/bin/sleep", "1000")
    world.write(LOCK, lock(stranger.pid))
    start = world.run("-restart", "-rcp_old_pid", str(stranger.pid))
    assert 0.9 < start.seconds < 4
    assert world.only_platform().argv == MAIN_ARGV


def test_the_restart_word_of_an_extension(world):
    """It counts for the wait and for the JVM without a console. The launcher's own line counts for the words that are
    left out of the command, and for the record of the start."""
    world.install("user", "config.e.1=-restart", "config.e.2=-console")
    world.base_properties("vmfix.noconsole=-Dfix")
    start = world.run("-config", "e")
    assert 0.9 < start.seconds < 4
    assert world.only_platform().argv == (
        HEAD + ["-console"] + areas() + STARTUP + ["-Dfix"] + system() + INSTALL_AREA)
    assert os.path.exists(CONFIG + "/args.properties")


@pytest.mark.within(90)
def test_an_old_platform_that_does_not_end_is_given_up_after_20_seconds(world):
    """The lock file is made blank, and the restart goes on as the main process. In a second workspace the blanks
    cannot be written: that is told each second, until the old platform ends by itself."""
    world.install()
    old, other = world.holder(ECLIPSE), world.holder(ECLIPSE)
    world.write(LOCK, lock(old.pid))
    world.write("/mnt/w/.rcp.lock", lock(other.pid))
    start = world.start("-restart", "-rcp_old_pid", str(old.pid))
    stuck = world.start("-restart", "-rcp_old_pid", str(other.pid), "-data", "/mnt/w", strace=[
        "-e", "trace=pwrite64", "-P", "/mnt/w/.rcp.lock", "-e", "inject=pwrite64:error=ENOSPC"])
    start.wait(40)
    platform = world.platform(0)
    assert 18.5 < start.seconds < 26
    assert platform.argv == MAIN_ARGV
    assert read(LOCK) == lock(platform.pid).ljust(14)
    assert read(MAIN) == "%d    " % platform.pid
    held = world.log()[:world.log().index("\n\nQVMRL0119I")] + "\n"
    assert held == (
        'QVMRL0030I: velmora main arguments="/mnt/app/rcp/velmora, -restart, -rcp_old_pid, %d, "\n\n' % old.pid
        + 19 * LOOK + EXPIRED + LOOK + lines("QVMRL0091E: No data in the platform lock file.",
                                             "QVMRL0303I: lock file captured @ <time>") + LOOK
        + lines("QVMRL0091E: No data in the platform lock file.", "QVMRL0304I: We are main process"))
    until(lambda: read("/dev/shm/strace").count("INJECTED") >= 2, "the second one has tried again", within=40)
    assert stuck.running()
    world.end(other)
    stuck.wait(10)
    log = read("/mnt/w/logs/velmora.log")
    tries = log.count(EXPIRED + "QVMRL0052E: Unable to invalidate platform lock file\n" + LOOK)
    assert log.count(EXPIRED) == tries and 2 <= tries <= 4
    assert "QVMRL0304I: We are main process\n" in log
