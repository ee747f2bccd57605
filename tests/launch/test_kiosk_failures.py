"""A kiosk in trouble: children that could not become the platform, and a request that cannot be made."""

import os

from world import (BASE, ECLIPSE, HEAD, HOME, INSTALL_AREA, LOCK, LOG, MAIN, STARTUP, areas, read, system, until)

EXIT_DATA = HOME + "/.exitData"
REQUEST = "/tmp/tzn_shutdown"
PLATFORM = HEAD + areas() + STARTUP + system(configuration="lockdown") + INSTALL_AREA
FAILED = "QVMRL0194E: Executing launcher failed! : No such file or directory\n"
# The child that failed flushes its streams and ends while the launcher is about to write into the lock file.
AT_ONCE = ["-P", LOCK, "-P", EXIT_DATA, "-e", "trace=open,openat,pwrite64,lseek,_llseek", "-e",
           "inject=open,openat:delay_enter=50000", "-e", "inject=pwrite64:delay_enter=150000", "-e",
           "inject=lseek,_llseek:delay_exit=150000"]


def test_children_that_fail_do_not_disturb_the_lock_file(world):
    """An earlier platform's number, which no process has, is in it. Each child that could not become the platform
    ends like a launcher, here while its parent records it; it is recorded all the same, and at last the platform."""
    world.install("lockdown")
    world.plan("write", EXIT_DATA, "bye")
    world.write(ECLIPSE, "no program", 0o755)
    world.write(LOCK, "4194303          ")
    launcher = world.start(strace=AT_ONCE)
    until(lambda: os.path.exists(LOG) and read(LOG).count(FAILED) >= 3, "three children have failed")
    world.stand_in(BASE + "/good")
    os.rename(BASE + "/good", ECLIPSE)
    assert launcher.wait().status == 0
    platform = world.only_platform()
    assert platform.argv == PLATFORM
    assert "QVMRL0051E" not in read(LOG)
    assert read(MAIN) == "%d    " % platform.pid
    # All of the old text is replaced: seventeen characters, and the number never has more than seven.
    assert len(read(LOCK)) == 17 and read(LOCK).rstrip(" ") == str(platform.pid)


def test_a_request_that_cannot_be_made_has_cleared_the_umask(world):
    """It is cleared before the request is opened, and stays so for the platform that is started again."""
    world.install("lockdown")
    world.folder(REQUEST)
    world.plan("write", EXIT_DATA, "shutdown", start=0)
    world.plan("write", EXIT_DATA, "bye", start=1)
    assert world.run(umask=0o027).status == 0
    assert [(platform.argv, platform.umask) for platform in world.platforms()] == [(PLATFORM, 0o027), (PLATFORM, 0)]
