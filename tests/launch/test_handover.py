"""The last act: the platform becomes a child, the lock is handed over, and sometimes the launcher waits."""

import os
import pathlib
import re
import signal
import subprocess

import pytest

from world import (APP, ECLIPSE, HEAD, INSTALL_AREA, JAVA, LAUNCHER, LOCK, MAIN, STARTUP, areas, executable, read,
                   state, system, until)

MAIN_ARGV = HEAD + areas() + STARTUP + system() + INSTALL_AREA
RELEASED = "QVMRL0306I: lock file released @ <time>\n"
END = "QVMRL0133I: ===== End Launch Parameters =====\n"
DELAYED_EXEC = ["-e", "trace=execve", "-e", "inject=execve:delay_enter=2000000"]
NO_FORK = ["-e", "trace=clone,clone3,fork,vfork", "-e", "inject=clone,clone3,fork,vfork:error=EAGAIN"]


@pytest.fixture
def in_front_of_exec(world, tmp_path_factory):
    """A library that does something of its own before each exec."""
    made = tmp_path_factory.mktemp("library") / "exec_preload.so"
    width = "-m32" if world._launcher[4] == 1 else "-m64"
    subprocess.run([os.environ.get("CC", "cc"), width, "-O1", "-shared", "-fPIC",
                    str(pathlib.Path(__file__).parent / "exec_preload.c"), "-o", str(made), "-ldl"], check=True)
    return made.read_bytes()


def test_a_library_in_front_of_the_exec_has_room(world, in_front_of_exec):
    """As an administrator preloads one that keeps a record of what is executed."""
    if world.sanitized:
        pytest.skip("the sanitizer's own library must come first")
    world.install()
    world.write("/mnt/exec_preload.so", in_front_of_exec)
    assert world.run(env={"LD_PRELOAD": "/mnt/exec_preload.so"}).status == 0
    platform = world.only_platform()
    assert platform.argv == MAIN_ARGV
    assert read(LOCK) == "%d          " % platform.pid


def forked(world):
    """The launcher's child, while it still runs the launcher."""
    return [pid for pid in world.strangers() if executable(pid) == LAUNCHER]


def sleeps_with_lock_file(pid):
    """It has opened the lock file and sleeps; up to the lock itself nothing else would make it sleep."""
    folder = "/proc/%d/fd/" % pid
    try:
        return state(pid) == "S" and LOCK in [os.readlink(folder + name) for name in os.listdir(folder)]
    except FileNotFoundError:  # one was closed in between
        return False


# ---- waiting

def test_without_a_reason_to_wait_the_launcher_is_gone_at_once(world):
    """While the platform lives on."""
    world.install()
    world.plan("wait", "exit", 9)
    assert world.run().status == 0
    assert world.only_platform().alive()


@pytest.mark.parametrize("words", [["-velmoraWait"], ["-console"], ["-vmargs", "-console"], ["-vmargs", "-velmoraWait"],
                                   ["vmarg.a=-console"]])
def test_words_that_make_it_wait(world, words):
    """It ends after the platform, and hides its status. The wait word counts among the launcher's own words, the
    console's in the command, wherever it came from. The lock is free meanwhile."""
    world.install()
    world.plan("wait", "exit", 7)
    start = world.start(*words)
    platform = world.platform()
    until(lambda: read(LOCK), "the platform is recorded")
    assert world.run().status == 0
    daemon = world.platform(1)
    assert "-useDaemon" in daemon.argv and daemon.alive()
    assert start.running()
    platform.end()
    assert start.wait().status == 0
    assert daemon.alive()


@pytest.mark.parametrize("words", [["-velmorawait"], ["-velmoraWaits"], ["-consoleLog"], ["-Console"],
                                   ["-console", "-restart"], ["vmarg.a=-velmoraWait"]])
def test_words_that_do_not_make_it_wait(world, words):
    world.install()
    world.plan("wait")
    assert world.run(*words).status == 0
    assert world.only_platform().alive()


def test_the_launchers_own_name_is_no_word_to_wait(world):
    world.install()
    world.plan("wait")
    assert world.run(argv0="-velmoraWait").status == 0
    assert world.only_platform().alive()


def test_a_platform_that_is_killed_ends_the_wait(world):
    world.install()
    world.plan("wait")
    start = world.start("-velmoraWait")
    os.kill(world.platform().pid, signal.SIGKILL)
    assert start.wait().status == 0


def test_a_caller_who_ignores_its_children(world):
    """The wait is for the platform all the same."""
    world.install()
    world.plan("wait")
    start = world.start("-velmoraWait", ignored=[signal.SIGCHLD])
    platform = world.platform()
    until(lambda: read(LOCK), "the platform is recorded")
    assert start.running()
    platform.end()
    assert start.wait().status == 0


def test_a_caller_who_ignores_its_children_and_a_platform_that_lives(world):
    """The living platform is recognised by the status of a command that the launcher runs itself."""
    world.install()
    holder = world.holder(ECLIPSE)
    world.write(LOCK, "%d          " % holder.pid)
    world.run(ignored=[signal.SIGCHLD])
    assert "-useDaemon" in world.only_platform().argv


# ---- the moment of the exec

def test_the_lock_is_stamped_only_when_the_platform_runs(world):
    """Between fork and exec the child still looks like the launcher. A second start that waits for the lock sees the
    platform, and is a daemon process."""
    world.install()
    world.plan("wait")
    first = world.start("-first", strace=DELAYED_EXEC)
    until(lambda: forked(world), "the first launcher has forked")
    second = world.start("-second")
    assert (read(LOCK), first.running(), second.running()) == ("", True, True)
    assert not os.path.exists(MAIN)
    assert first.wait().status == 0
    assert second.wait().status == 0
    # Either may be the first to record itself: the lock is free as soon as the other one is executed.
    main, daemon = sorted(world.platforms(), key=lambda platform: "-second" in platform.argv)
    assert main.argv == HEAD + ["-first"] + areas() + STARTUP + system() + INSTALL_AREA
    assert daemon.argv == (
        HEAD + ["-second"] + areas() + ["-useDaemon", str(main.pid)] + STARTUP + system() + INSTALL_AREA)
    assert read(LOCK) == "%d          " % main.pid


def test_many_starts_at_once_make_one_main_process(world):
    world.install()
    world.plan("wait")
    starts = [world.start("-n%d" % number) for number in range(6)]
    for start in starts:
        assert start.wait().status == 0
    platforms = world.platforms()
    assert len(platforms) == 6
    mains = [platform for platform in platforms if "-useDaemon" not in platform.argv]
    assert len(mains) == 1
    for platform in platforms:
        if platform is not mains[0]:
            assert platform.argv[platform.argv.index("-useDaemon") + 1] == str(mains[0].pid)
    assert read(LOCK) == "%d          " % mains[0].pid


def test_a_launcher_that_is_killed_before_it_has_recorded_the_platform(world):
    """The lock stays with the platform, so a second start waits until that has ended, and is the main process then."""
    world.install()
    world.plan("wait")
    first = world.start("-first", strace=DELAYED_EXEC)
    until(lambda: forked(world), "the launcher has forked")
    os.kill(first.pid, signal.SIGKILL)
    assert first.wait().status == -signal.SIGKILL
    platform = world.platform()
    assert read(LOCK) == ""
    second = world.start("-second")
    until(lambda: sleeps_with_lock_file(second.pid), "the second launcher waits for the lock")
    assert len(world.platforms()) == 1
    platform.end()
    assert second.wait().status == 0
    argv = world.platforms()[1].argv
    assert argv == HEAD + ["-second"] + areas() + STARTUP + system() + INSTALL_AREA


# ---- what cannot be started

def test_a_platform_that_the_system_cannot_start(world):
    """One line of the child's, whatever is traced; the status is 0 and the lock is free."""
    world.install()
    world.write(ECLIPSE, "no program", 0o755)
    start = world.run()
    assert (start.status, world.platforms()) == (0, [])
    log = world.log()
    assert sorted(log[log.index(END) + len(END):].splitlines()) == [
        RELEASED.strip(), "Unable to execute %s : Exec format error" % ECLIPSE]
    assert start.seconds < 5


def test_a_platform_that_the_system_cannot_start_and_no_descriptor_is_left(world):
    """The child says so all the same, and nobody waits for it."""
    world.install()
    world.write(ECLIPSE, "no program", 0o755)
    start = world.run(strace=["-e", "trace=pipe2", "-e", "inject=pipe2:error=EMFILE"])
    assert read("/dev/shm/strace").count("INJECTED") == 1
    assert (start.status, world.platforms()) == (0, [])
    log = world.log()
    assert sorted(log[log.index(END) + len(END):].splitlines()) == [
        RELEASED.strip(), "Unable to execute %s : Exec format error" % ECLIPSE]


def failed_children():
    """The exit statuses of the processes that have said that they could not be executed. The tracer saw them."""
    said, statuses = set(), []
    for pid, call in re.findall(r"^(\d+) +(.*)$", read("/dev/shm/strace"), re.M):
        if re.match(r'write\(\d+, "Unable to execute ', call):
            said.add(pid)
        ended = re.match(r"exit_group\((-?\d+)", call)
        if ended and pid in said:
            statuses.append(int(ended.group(1)) & 0xff)
    return statuses


@pytest.mark.parametrize("words", [[], ["-velmoraWait"]])
def test_the_status_of_a_child_that_could_not_be_executed(world, words):
    """It goes on as a launcher that has nothing to do."""
    world.install()
    world.write(ECLIPSE, "no program", 0o755)
    assert world.run(*words, strace=["-s", "100", "-e", "trace=write,exit_group"]).status == 0
    world.all_ended()
    assert failed_children() == [0]


def test_after_a_failed_start_the_next_one_is_main(world):
    world.install()
    world.write(ECLIPSE, "no program", 0o755)
    world.run()
    world.all_ended()
    world.stand_in(ECLIPSE)
    world.run()
    platform = world.only_platform()
    assert platform.argv == MAIN_ARGV
    assert read(LOCK) == "%d          " % platform.pid


@pytest.mark.parametrize("words", [["-velmoraWait"], ["-console"]])
def test_a_failed_start_is_not_waited_for(world, words):
    world.install()
    world.write(ECLIPSE, "no program", 0o755)
    start = world.run(*words)
    assert (start.status, world.platforms()) == (0, [])
    assert "Unable to execute %s : Exec format error\n" % ECLIPSE in world.log()


def test_a_service_whose_vm_is_missing(world):
    """There is no earlier test for the JVM, so it is the exec that fails."""
    world.install("service", "jvm.location=" + JAVA)
    start = world.run()
    assert (start.status, world.platforms()) == (0, [])
    assert "Unable to execute %s : No such file or directory\n" % JAVA in read(
        APP + "/eclipse/.workspace/logs/velmora.log")


def test_a_service_whose_vm_may_not_be_executed(world):
    world.install("service", "jvm.location=" + JAVA)
    world.write(JAVA, "", 0o644)
    assert world.run().status == 0
    assert "Unable to execute %s : Permission denied\n" % JAVA in read(APP + "/eclipse/.workspace/logs/velmora.log")


@pytest.mark.parametrize("words", [[], ["-velmoraWait"]])
def test_a_fork_that_fails(world, words):
    """An error line with the reason; nothing is written into the lock file, and it is free."""
    world.install()
    start = world.run(*words, strace=NO_FORK)
    assert (start.status, world.platforms()) == (0, [])
    log = world.log()
    told = log[log.index(END) + len(END):].splitlines()
    assert len(told) == 2 and told[1] + "\n" == RELEASED
    assert told[0].endswith(" : Resource temporarily unavailable")
    assert (read(LOCK), os.path.exists(MAIN)) == ("", False)
    world.run()
    assert world.only_platform().argv == HEAD + areas() + STARTUP + system() + INSTALL_AREA


def test_a_command_that_is_too_long_for_the_system(world):
    """One word may have 128 KB; the user's own words are short here, the property is not."""
    world.install()
    long = "".join("%s${prop.p}" % letter for letter in "abcdefgh" * 20)
    world.base_properties("p=" + "x" * 2000, "-Dlong=" + long)
    start = world.run()
    assert (start.status, world.platforms()) == (0, [])
    assert "Unable to execute %s : Argument list too long\n" % ECLIPSE in world.log()


def test_the_log_of_a_daemon_process_is_released_too(world):
    """It does not write the lock file, but lets it go."""
    world.install()
    world.plan("wait")
    world.run()
    world.run()
    assert world.log().endswith(END + RELEASED)
