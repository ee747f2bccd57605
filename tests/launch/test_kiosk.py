"""The kiosk: the launcher starts the platform again each time it ends, until it asks for the end of the session.

The session's end is a library that a site provides in the current directory; here the test builds it. It writes a
line into a file for each call. killall and the desktop session are stand-ins of the test's own.
"""

import fcntl
import os
import resource
import subprocess

import pytest

from test_handover import failed_children
from world import (BASE, ECLIPSE, HEAD, HOME, INSTALL_AREA, LAUNCHER, LOCK, LOG, MAIN, STARTUP, areas, read,
                   read_bytes, system, tree, until)

EXIT_DATA = HOME + "/.exitData"
REQUEST = "/tmp/tzn_shutdown"
CALLS = "/mnt/calls"
KILLED = "/mnt/killed"
PLATFORM = HEAD + areas() + STARTUP + system(configuration="lockdown") + INSTALL_AREA

# No header of the C library, which need not be there for the launcher's width.
LIBRARY = """
int open(const char *path, int flags, ...);
long write(int file, const void *bytes, unsigned long count);
int close(int file);
int access(const char *path, int mode);
_Bool NAME(void)
{
    int file = open("/mnt/calls", 02001 | 0100, 0666);
    write(file, access("/tmp/tzn_shutdown", 0) == 0 ? "shutdown\\n" : "logoff\\n",
          access("/tmp/tzn_shutdown", 0) == 0 ? 9 : 7);
    close(file);
    return RESULT;
}
"""


@pytest.fixture(scope="module")
def libraries(tmp_path_factory):
    """The session libraries for the launcher's width, as bytes: one that returns true, one false, one without the
    symbol."""
    from conftest import BUILT
    folder = tmp_path_factory.mktemp("session")
    (folder / "lockdown.c").write_text(LIBRARY)
    width = "-m32" if BUILT["launcher"][4] == 1 else "-m64"
    made = {}
    for name, symbol, result in (("true", "logoff", "1"), ("false", "logoff", "0"), ("nosymbol", "logout", "1")):
        subprocess.run([os.environ.get("CC", "cc"), width, "-shared", "-fPIC", "-nostdlib", "-DNAME=" + symbol,
                        "-DRESULT=" + result, "lockdown.c", "-o", name + ".so"], cwd=folder, check=True)
        made[name] = (folder / (name + ".so")).read_bytes()
    return made


def install(world, library=None, *more):
    world.install("lockdown", *more)
    world.write("/mnt/bin/killall", '#!/bin/sh\necho "$@" >>%s\n' % KILLED, 0o755)
    if library is not None:
        world.write("/mnt/lockdown.so", library, 0o755)


def asks(world, *words):
    """Each platform leaves the next of these words; None leaves nothing."""
    for number, word in enumerate(words):
        world.plan(*([] if word is None else ["write", EXIT_DATA, word]), start=number)


# A platform that leaves an unknown word ends the supervision; so ends each story that must end.
END = "bye"


def start(world, *words, **how):
    return world.start(*words, env={"PATH": "/mnt/bin:/usr/bin:/bin"}, **how)


def run(world, *words, **how):
    return start(world, *words, **how).wait()


def calls():
    return read(CALLS).splitlines() if os.path.exists(CALLS) else []


def killed():
    return read(KILLED).splitlines() if os.path.exists(KILLED) else []


def outcome(world, status):
    """What has happened: the launcher's status, the number of platforms, the calls of the library, of killall."""
    return status, len(world.platforms()), calls(), killed()


# ---- the end of the session

def test_logoff(world, libraries):
    """The library begins the session's end: the launcher ends with status 0, and nothing else is done."""
    install(world, libraries["true"])
    asks(world, "logoff")
    assert outcome(world, run(world).status) == (0, 1, ["logoff"], [])
    assert not os.path.exists(REQUEST)
    assert world.platform().argv == PLATFORM


def test_shutdown(world, libraries):
    """The request is there when the library is called."""
    install(world, libraries["true"])
    asks(world, "shutdown")
    assert outcome(world, run(world).status) == (0, 1, ["shutdown"], [])


def test_the_home_that_the_installation_sets_is_where_the_platform_asks(world, libraries):
    """What lies in the home of the start is neither read nor removed; the name may hold a blank."""
    install(world, libraries["true"])
    world.base_properties("env.set.HOME=/mnt/h 2")
    world.folder("/mnt/h 2", 0o777)
    world.write("/mnt/h 2/.exitData", "logoff")
    world.write(EXIT_DATA, "logoff")
    world.plan(start=0)
    world.plan("write", "/mnt/h 2/.exitData", "logoff", start=1)
    assert outcome(world, run(world).status) == (0, 2, ["logoff"], [])
    assert read(EXIT_DATA) == "logoff"


def test_the_request_for_a_shutdown_byte_for_byte(world, libraries):
    """512 bytes: "shutdown" and its zero, "1" and its zero at 256. All may read and write it, whatever the umask."""
    install(world, libraries["true"])
    asks(world, "shutdown")
    run(world, umask=0o077)
    assert read_bytes(REQUEST) == b"shutdown" + bytes(248) + b"1" + bytes(255)
    assert tree("/tmp") == ["0666 tzn_shutdown"]


def test_an_earlier_request_is_replaced(world, libraries):
    """It is cut, and its mode is set."""
    install(world, libraries["true"])
    world.write(REQUEST, b"x" * 1000, 0o600)
    asks(world, "shutdown")
    run(world)
    assert read_bytes(REQUEST) == b"shutdown" + bytes(248) + b"1" + bytes(255)
    assert tree("/tmp") == ["0666 tzn_shutdown"]


def test_a_request_that_cannot_be_made(world, libraries):
    """The library is not called, and the platform is started again."""
    install(world, libraries["true"])
    world.folder(REQUEST)
    asks(world, "shutdown", END)
    assert outcome(world, run(world).status) == (0, 2, [], [])


@pytest.mark.parametrize("word", ["logoff", "shutdown"])
def test_a_library_that_refuses(world, libraries, word):
    """It returns false: the platform is started again, as often as it asks."""
    install(world, libraries["false"])
    asks(world, word, word, END)
    assert outcome(world, run(world).status) == (0, 3, [word, word], [])
    assert [platform.argv for platform in world.platforms()] == [PLATFORM] * 3


def test_after_a_refused_shutdown_the_platform_has_no_umask(world, libraries):
    """It was cleared for the request, and stays so."""
    install(world, libraries["false"])
    asks(world, "shutdown", END)
    run(world, umask=0o027)
    assert [platform.umask for platform in world.platforms()] == [0o027, 0]


@pytest.mark.parametrize("word", ["logoff", "shutdown"])
def test_no_library(world, word):
    """None in the current directory: the GNOME session is ended, and the launcher with status 1."""
    install(world)
    world.write("/mnt/app/lockdown.so", "no library here")
    asks(world, word)
    assert outcome(world, run(world).status) == (1, 1, [], ["gnome-session"])
    assert os.path.exists(REQUEST) == (word == "shutdown")


@pytest.mark.parametrize("word", ["logoff", "shutdown"])
def test_a_library_without_the_function(world, libraries, word):
    """The same as none."""
    install(world, libraries["nosymbol"])
    asks(world, word)
    assert outcome(world, run(world).status) == (1, 1, [], ["gnome-session"])


def test_a_library_that_is_none(world):
    install(world, b"no library")
    asks(world, "logoff")
    assert outcome(world, run(world).status) == (1, 1, [], ["gnome-session"])


def test_the_library_is_that_of_the_current_directory(world, libraries):
    install(world, libraries["true"])
    asks(world, "logoff")
    world.folder("/mnt/elsewhere")
    assert outcome(world, run(world, cwd="/mnt/elsewhere").status) == (1, 1, [], ["gnome-session"])


def test_the_session_ends_when_killall_is_the_sessions_own(world):
    """A stand-in for the session is ended by a stand-in for killall, by its number."""
    install(world)
    world.stand_in("/mnt/bin/gnome-session")
    session = world.holder("/mnt/bin/gnome-session")
    world.write("/mnt/bin/killall", '#!/bin/sh\n[ "$*" = gnome-session ] && kill %d\n' % session.pid, 0o755)
    asks(world, "logoff")
    assert run(world).status == 1
    assert session.wait() == -15


# ---- what is no request

@pytest.mark.parametrize("word", [
    "logoff\n", "shutdown\n", "shutdown\nlogoff", "", "\n", END, "Logoff", " logoff", "logoff ", "logoffs", "logof",
    "shutdown now", "x" * 1022 + "\nlogoff", "x" * 1023 + "logoff"])
def test_an_unknown_word_ends_the_supervision(world, libraries, word):
    """The session goes on: neither the library nor killall is called. A word with a line end is unknown, and so is an
    empty file."""
    install(world, libraries["true"])
    asks(world, word)
    assert outcome(world, run(world).status) == (0, 1, [], [])
    assert not os.path.exists(REQUEST)


def test_a_file_that_cannot_be_read_is_as_good_as_none(world, libraries):
    """The platform is started again; then the file is removed first."""
    install(world, libraries["true"])
    asks(world, None, END)
    world.plan("write", EXIT_DATA, "logoff", "wait", start=0)
    launcher = start(world)
    platform = world.platform()
    until(lambda: os.path.exists(EXIT_DATA), "the platform has asked")
    os.chmod(EXIT_DATA, 0)
    platform.end()
    assert outcome(world, launcher.wait().status) == (0, 2, [], [])


def test_what_an_earlier_session_left_does_not_count(world, libraries):
    """It is removed before each start of a platform, with all that it holds."""
    install(world, libraries["true"])
    world.write(EXIT_DATA, "logoff")
    asks(world, None, None, END)
    assert outcome(world, run(world).status) == (0, 3, [], [])


def test_a_folder_of_that_name_is_removed_as_well(world, libraries):
    install(world, libraries["true"])
    world.write(EXIT_DATA + "/mine", "x")
    asks(world, "logoff")
    assert outcome(world, run(world).status) == (0, 1, ["logoff"], [])


def test_the_home_of_the_user_is_one_word_whatever_it_holds(world):
    """The stale word of an earlier session is removed there: it would end the supervision after the first platform."""
    home = "/mnt/my * home"
    install(world)
    world.write(home + "/.exitData", END)
    world.plan("write", home + "/.exitData", END, start=1)
    launcher = world.start(env={"PATH": "/mnt/bin:/usr/bin:/bin", "HOME": home}).wait()
    assert outcome(world, launcher.status) == (0, 2, [], [])


def test_a_folder_that_the_platform_leaves_is_an_unknown_word(world, libraries):
    """It can be opened, and no line can be read from it."""
    install(world, libraries["true"])
    world.plan("wait")
    launcher = start(world)
    platform = world.platform()
    world.folder(EXIT_DATA)
    platform.end()
    assert outcome(world, launcher.wait().status) == (0, 1, [], [])


def test_the_word_is_left_where_it_is(world, libraries):
    install(world, libraries["true"])
    asks(world, "logoff")
    run(world)
    assert read(EXIT_DATA) == "logoff"


# ---- the supervision

def descriptors(pid):
    found = {}
    for number in os.listdir("/proc/%d/fd" % pid):
        found[number] = os.readlink("/proc/%d/fd/%s" % (pid, number))
    return found


def memory(pid):
    """Kilobytes that the process has written to, and those it has asked for."""
    with open("/proc/%d/status" % pid) as file:
        found = dict(line.split(":", 1) for line in file)
    return tuple(int(found[name].split()[0]) for name in ("VmData", "VmRSS"))


def test_a_platform_that_ends_without_a_word_is_started_200_times(world):
    """No descriptor and no memory is lost on the way; each platform is given the same, and is in the control files."""
    install(world)
    world.plan("wait", start=1)
    world.plan("wait", "write", EXIT_DATA, END, start=201)
    launcher = start(world)
    second = world.platform(1)
    until(lambda: read(LOCK) == "%d          " % second.pid, "the second platform is recorded")
    before = descriptors(launcher.pid), memory(launcher.pid)
    second.end()
    last = world.platform(201, within=100)
    until(lambda: read(LOCK).startswith("%d  " % last.pid), "the last platform is recorded")
    assert read(MAIN) == "%d    " % last.pid
    after = descriptors(launcher.pid), memory(launcher.pid)
    assert after[0] == before[0]
    from conftest import BUILT
    if b"__asan_init" not in BUILT["launcher"]:
        # The address sanitizer keeps freed memory; it looks for leaks itself when the launcher ends.
        assert after[1][0] == before[1][0]
        assert after[1][1] - before[1][1] <= 256
    last.end()
    assert launcher.wait().status == 0
    platforms = world.platforms()
    assert len(platforms) == 202
    assert all(platform.argv == PLATFORM for platform in platforms)
    assert all(platform.descriptors == platforms[0].descriptors for platform in platforms)


def test_no_descriptor_is_lost_with_a_word_that_is_read(world, libraries):
    """Each platform leaves one, and the library refuses it."""
    install(world, libraries["false"])
    world.plan("write", EXIT_DATA, "logoff")
    world.plan("wait", "write", EXIT_DATA, "logoff", start=1)
    world.plan("wait", "write", EXIT_DATA, END, start=9)
    launcher = start(world)
    second = world.platform(1)
    until(lambda: read(LOCK) == "%d          " % second.pid, "the second platform is recorded")
    before = descriptors(launcher.pid)
    second.end()
    last = world.platform(9)
    until(lambda: read(LOCK).startswith("%d  " % last.pid), "the last platform is recorded")
    assert descriptors(launcher.pid) == before
    last.end()
    assert outcome(world, launcher.wait().status) == (0, 10, ["logoff"] * 9, [])


def test_each_platform_is_recorded_and_the_lock_is_free_while_it_lives(world):
    """A second launcher becomes a daemon process, which is not supervised: it returns while its platform lives."""
    install(world)
    world.plan("wait", "write", EXIT_DATA, END, start=0)
    world.plan("wait", start=1)
    launcher = start(world)
    first = world.platform()
    until(lambda: read(LOCK) == "%d          " % first.pid, "the platform is recorded")
    assert read(MAIN) == "%d    " % first.pid
    assert run(world).status == 0
    second = world.platform(1)
    assert second.alive() and "-useDaemon" in second.argv
    assert launcher.running()
    second.end()
    first.end()
    assert launcher.wait().status == 0
    assert len(world.platforms()) == 2


def test_the_status_of_a_platform_does_not_matter(world):
    install(world)
    world.plan("exit", 77, start=0)
    world.plan("write", EXIT_DATA, END, "exit", 77, start=1)
    assert outcome(world, run(world).status) == (0, 2, [], [])


def test_a_platform_that_is_killed_is_started_again(world):
    install(world)
    world.plan("wait", start=0)
    world.plan("write", EXIT_DATA, END, start=1)
    launcher = start(world)
    os.kill(world.platform().pid, 9)
    assert outcome(world, launcher.wait().status) == (0, 2, [], [])


def test_a_failed_wait_is_made_again_for_the_same_platform(world):
    """It is not started a second time, and recorded again. The first wait is the shell's, the second the platform's."""
    install(world)
    world.plan("sleep", 300, "write", EXIT_DATA, END)
    launcher = start(world, strace=["-e", "trace=wait4", "-e", "inject=wait4:error=EINTR:when=2"])
    assert outcome(world, launcher.wait().status) == (0, 1, [], [])
    assert world.log().count("QVMRL0306I: lock file released @ <time>\n") == 2
    platform = world.only_platform()
    assert (read(LOCK), read(MAIN)) == ("%d          " % platform.pid, "%d    " % platform.pid)


def test_a_command_of_a_daemon_process_is_not_supervised(world):
    """Its word came from the user, and this is the main process: the launcher returns while the platform lives."""
    install(world)
    world.plan("wait")
    assert run(world, "-useDaemon").status == 0
    platform = world.only_platform()
    assert platform.alive()
    assert platform.argv == (HEAD + ["-useDaemon"] + areas() + STARTUP + system(configuration="lockdown")
                             + INSTALL_AREA)


@pytest.mark.world(uid=0)
def test_the_administrator_is_not_supervised(world, libraries):
    """The launcher returns while the platform lives, and what that leaves when it ends is nobody's."""
    install(world, libraries["true"])
    world.plan("wait", "write", EXIT_DATA, "logoff")
    assert run(world).status == 0
    platform = world.platform()
    assert platform.alive()
    platform.end()
    assert outcome(world, 0) == (0, 1, [], [])


@pytest.mark.parametrize("configuration", ["user", "multiuser", "serial.multiuser", "userpb"])
def test_no_other_configuration_is_supervised(world, libraries, configuration):
    world.install(configuration)
    world.write("/mnt/lockdown.so", libraries["true"])
    world.write(EXIT_DATA, "mine")
    asks(world, "logoff")
    assert world.run("-velmoraWait").status == 0
    assert len(world.platforms()) == 1 and calls() == []


# ---- trouble

NO_FORK = "Unable to start %s : Resource temporarily unavailable" % ECLIPSE


def start_without_processes(world, *words):
    """A launcher that may make no process, until it is allowed to."""
    return start(world, "--nproc=0:", LAUNCHER, *words, program="/usr/bin/prlimit")


def allow_processes(world, launcher):
    most = resource.getrlimit(resource.RLIMIT_NPROC)[0]
    limit = "unlimited" if most == resource.RLIM_INFINITY else most
    subprocess.run(["/usr/bin/prlimit", "--pid", str(launcher.pid), "--nproc=%s:" % limit], user=world.uid,
                   group=world.uid, check=True)


def test_a_failed_fork(world):
    """It is told; nothing is recorded, the lock is free, and a second later it is tried again."""
    install(world)
    asks(world, END)
    launcher = start_without_processes(world)
    until(lambda: os.path.exists(LOG) and read(LOG).count(NO_FORK) == 2, "two forks have failed")
    assert launcher.running() and read(LOCK) == "" and not os.path.exists(MAIN)
    with open(LOCK) as lock:
        fcntl.flock(lock, fcntl.LOCK_EX | fcntl.LOCK_NB)
    allow_processes(world, launcher)
    assert launcher.wait().status == 0
    assert launcher.seconds >= 2.0
    platform = world.only_platform()
    log = read(LOG).splitlines()
    failed = log.count(NO_FORK)
    assert [line[:29] for line in log[log.index(NO_FORK):]] == (
        [NO_FORK[:29], "QVMRL0306I: lock file release"] * failed + ["QVMRL0306I: lock file release"])
    assert read(LOCK) == "%d          " % platform.pid


def test_a_failed_fork_outside_of_a_kiosk(world):
    """It is told, and the launcher ends as after a start; the lock file names nobody."""
    world.install()
    every_call = "clone,clone3,fork,vfork"
    launcher = world.run("-velmoraWait", strace=["-e", "trace=" + every_call, "-e",
                                               "inject=" + every_call + ":error=EAGAIN"])
    assert launcher.status == 0
    assert world.platforms() == []
    assert NO_FORK in read(LOG).splitlines()
    assert read(LOCK) == ""
    assert not os.path.exists(MAIN)


FAILED = "QVMRL0194E: Executing launcher failed! : No such file or directory\n"


def test_a_platform_that_cannot_be_executed(world):
    """Each child that could not become the platform says so and ends; the launcher itself goes on, and starts the
    platform as soon as it can be."""
    install(world)
    asks(world, END)
    world.write(ECLIPSE, "no program", 0o755)
    launcher = start(world)
    until(lambda: os.path.exists(LOG) and read(LOG).count(FAILED) >= 3, "three children have failed")
    assert launcher.running() and world._records() == []
    world.stand_in(BASE + "/good")
    os.rename(BASE + "/good", ECLIPSE)
    assert launcher.wait().status == 0
    platform = world.only_platform()
    assert (platform.argv, read(LOCK)) == (PLATFORM, "%d          " % platform.pid)
    log = read(LOG)
    assert log.count(FAILED) == log.count("Unable to execute %s : Exec format error\n" % ECLIPSE) >= 3


def test_the_status_of_a_child_that_could_not_be_executed(world):
    """Each ends with that of a fatal error."""
    install(world)
    asks(world, END)
    world.write(ECLIPSE, "no program", 0o755)
    launcher = start(world, strace=["-s", "100", "-e", "trace=write,exit_group"])
    until(lambda: os.path.exists(LOG) and FAILED in read(LOG), "a child has failed")
    world.stand_in(BASE + "/good")
    os.rename(BASE + "/good", ECLIPSE)
    assert launcher.wait().status == 0
    world.all_ended()
    statuses = failed_children()
    assert len(statuses) >= 1 and set(statuses) == {255}


def test_a_child_that_failed_leaves_the_earlier_word_to_nobody(world):
    """The word of an earlier session was removed before, so the child finds none and fails; it never ends a session."""
    install(world)
    world.write(EXIT_DATA, "logoff")
    world.write(ECLIPSE, "no program", 0o755)
    asks(world, END)
    launcher = start(world)
    until(lambda: os.path.exists(LOG) and read(LOG).count(FAILED) >= 1, "a child has failed")
    assert killed() == [] and launcher.running()
    world.stand_in(BASE + "/good")
    os.rename(BASE + "/good", ECLIPSE)
    assert outcome(world, launcher.wait().status) == (0, 1, [], [])


def test_a_provisioning_run_is_not_supervised(world, libraries):
    """Its word is nobody's; the next start supervises the platform."""
    install(world, libraries["true"], "provisioning=true", "provisioning.application=org.prov",
            "provisioning.manifest.version=1")
    world.base_properties("provisioning.manifest.version=1")
    asks(world, "logoff", "logoff")
    assert outcome(world, run(world).status) == (0, 1, [], [])
    assert outcome(world, run(world).status) == (0, 2, ["logoff"], [])


def test_a_restart_is_supervised_too(world, libraries):
    install(world, libraries["true"])
    asks(world, None, "logoff")
    assert outcome(world, run(world, "-restart").status) == (0, 2, ["logoff"], [])
