"""One main process for each workspace: the lock file, the pid file, and when a start becomes a daemon process."""

import datetime
import fcntl
import os
import re
import time

import pytest

from world import (BASE, CONFIG, ECLIPSE, HEAD, INSTALL_AREA, LOCK, LOG, MAIN, STARTUP, TEMP_LOG, WORKSPACE, areas,
                   lines, read, read_bytes, state, system, system_time, temp_logs, until, untimed)

BAD_LOCK = "QVMRL0092E: Error reading platform lock file."
MAIN_LINE = "QVMRL0304I: We are main process\n"
DAEMON_LINE = "QVMRL0305I: We are daemon process\n"
NO_DATA = "QVMRL0091E: No data in the platform lock file.\n"


def daemon(pid, workspace=WORKSPACE, eclipse=ECLIPSE):
    return ([eclipse, "--launcher.suppressErrors"] + areas(workspace) + ["-useDaemon", str(pid)] + STARTUP
            + system(workspace) + INSTALL_AREA)


def main(workspace=WORKSPACE, eclipse=ECLIPSE):
    return ([eclipse, "--launcher.suppressErrors"] + areas(workspace) + STARTUP + system(workspace) + INSTALL_AREA)


def test_the_main_process_records_its_platform(world):
    """The lock file has ten blanks behind the number, the pid file four, neither a line end."""
    world.install()
    world.run()
    platform = world.only_platform()
    assert read_bytes(LOCK) == b"%d          " % platform.pid
    assert read_bytes(MAIN) == b"%d    " % platform.pid
    assert platform.argv == main()


def test_a_second_start_while_the_platform_lives(world):
    """It is a daemon process, knows the platform by its number, and changes neither file nor record."""
    world.install("user", "jvm.location=/mnt/jvm/bin/java")
    world.plan("wait")
    world.run("-first")
    first = world.platform(0)
    recorded = read(CONFIG + "/args.properties")
    assert world.run("-second").status == 0
    second = world.platform(1)
    assert second.argv == (HEAD + ["-second"] + areas() + ["-vm", "/mnt/jvm/bin/java", "-useDaemon", str(first.pid)]
                           + STARTUP + system() + INSTALL_AREA)
    assert DAEMON_LINE in world.log() and MAIN_LINE not in world.log()
    assert read(LOCK) == "%d          " % first.pid
    assert read(MAIN) == "%d    " % first.pid
    assert read(CONFIG + "/args.properties") == recorded
    assert first.alive() and second.alive()
    world.run("-third")
    assert world.platform(2).argv == HEAD + ["-third"] + areas() + ["-vm", "/mnt/jvm/bin/java", "-useDaemon",
                                     str(first.pid)] + STARTUP + system() + INSTALL_AREA


def test_after_the_platform_has_ended_the_next_start_is_main_again(world):
    """A daemon process that still lives is not in the lock file, and does not count."""
    world.install()
    world.plan("wait")
    world.run()
    world.run()
    world.platform(0).end()
    world.run()
    third = world.platform(2)
    assert third.argv == main()
    assert read(LOCK) == "%d          " % third.pid
    assert read(MAIN) == "%d    " % third.pid


def test_a_daemon_process_makes_the_user_area_too(world):
    world.install()
    world.folder(os.path.dirname(LOCK))
    holder = world.holder(ECLIPSE)
    world.write(LOCK, "%d          " % holder.pid)
    assert world.run().status == 0
    assert world.only_platform().argv == daemon(holder.pid)
    assert sorted(os.listdir(CONFIG)) == ["config.ini", "org.eclipse.update", "rcpinstall.properties"]
    assert os.listdir(CONFIG + "/org.eclipse.update") == ["platform.xml"]
    assert not os.path.exists(MAIN)


def test_a_daemon_process_never_provisions(world):
    """Though its area is new and the installation asks for it."""
    world.install("user", "provisioning=true", "provisioning.application=org.prov")
    world.folder(os.path.dirname(LOCK))
    holder = world.holder(ECLIPSE)
    world.write(LOCK, "%d          " % holder.pid)
    assert world.run().status == 0
    assert world.only_platform().argv == daemon(holder.pid)


def test_workspaces_do_not_know_of_each_other(world):
    world.install()
    world.plan("wait")
    world.run("-data", "/mnt/a")
    assert world.platform(0).argv == main("/mnt/a")
    world.run("-data", "/mnt/b")
    assert world.platform(1).argv == main("/mnt/b")


# ---- what is in the lock file

@pytest.mark.parametrize("content, no_data", [
    ("", True), ("              ", True), ("\n\n", True), ("\t \n", True),
    ("99999          ", False), ("99999", False), ("  \n99999", False), ("99999junk", False), ("-99999", False),
    ("+99999", False), ("0", False), ("2147483648", False), ("4294967297", False), ("-9999999999", False),
    ("99999999999999999999", False),
])
def test_a_lock_file_without_a_living_platform(world, content, no_data):
    """Blank, or with the number of a process that is gone or cannot be: this start is the main process."""
    world.install()
    world.write(LOCK, content, 0o600)
    assert world.run().status == 0
    platform = world.only_platform()
    assert platform.argv == main()
    assert (NO_DATA in world.log()) == no_data
    assert MAIN_LINE in world.log()
    number = "%d          " % platform.pid
    assert read(LOCK) == number + content[len(number):]


def test_longer_content_stays_behind_the_ten_blanks(world):
    """The file is written over from its start, and not cut."""
    world.install()
    world.write(LOCK, "99999abcdefghijklmnopq")
    world.run()
    number = "%d          " % world.only_platform().pid
    assert read(LOCK) == number + "99999abcdefghijklmnopq"[len(number):]


def test_the_time_of_the_lock_is_when_it_was_had(world):
    """Not when the start began to wait for it."""
    world.install()
    world.write(LOCK, "")
    with open(LOCK, "r+b") as held:
        fcntl.flock(held, fcntl.LOCK_EX)
        start = world.start()
        until(lambda: state(start.pid) == "S", "the launcher waits")
        time.sleep(0.5)
        released = system_time()
    assert start.wait().status == 0
    told = re.search(r"^QVMRL0303I: lock file captured @ (\d{8}_\d{6}_\d{3})$", read(LOG), re.M).group(1)
    assert datetime.datetime.strptime(told + "999", "%Y%m%d_%H%M%S_%f") >= released


@pytest.mark.parametrize("content", ["junk", "x1", "- 99999", ".", "\n\nx", "\0", "#1"])
def test_a_lock_file_that_does_not_begin_with_a_number(world, content):
    """The error lands in a log of its own in /tmp, since tracing is forced then; the lock file stays as it is."""
    world.install()
    world.write(LOCK, content)
    world.fatal(world.run(), BAD_LOCK)
    assert read(LOCK) == content
    (log,) = temp_logs()
    assert log != TEMP_LOG
    held = untimed(read(log)).rpartition("\nQVMRL0092E")[0]
    assert held == ('QVMRL0030I: velmora main arguments="/mnt/app/rcp/velmora, "\n\n'
                    "QVMRL0303I: lock file captured @ <time>\n"
                    "QVMRL0090E: Existing platform lock file found - checking validity.")
    assert sorted(os.listdir(WORKSPACE)) == [".rcp.lock"]


def test_a_living_process_that_is_not_the_platform(world):
    """The number was given to another program since."""
    world.install()
    holder = world.holder("/bin/sleep", "1000")
    world.write(LOCK, "%d          " % holder.pid)
    world.run()
    assert world.only_platform().argv == main()
    assert read(LOCK) == "%d          " % world.only_platform().pid


def test_the_name_of_the_platform_decides(world):
    """A platform under another name is a stranger to this installation."""
    world.install("user", "eclipse.name=other")
    world.stand_in(BASE + "/linux/x86/other")
    holder = world.holder(ECLIPSE)
    world.write(LOCK, "%d          " % holder.pid)
    world.run()
    assert world.only_platform().argv == main(eclipse=BASE + "/linux/x86/other")


@pytest.mark.parametrize("name", ["clip", "ecl.pse", "my eclipse", "it's", "a;b", "x" * 90, "x" * 150])
def test_names_that_find_a_living_platform(world, name):
    """It is searched for as a pattern in what the system tells of the process: a part of a name is enough, and of one
    that is too long a part is looked for."""
    program = BASE + "/linux/x86/" + name
    world.install("user", "eclipse.name=" + name)
    world.stand_in(program)
    holder = world.holder(ECLIPSE if name in ("clip", "ecl.pse") else program)
    world.write(LOCK, "%d          " % holder.pid)
    world.run()
    assert world.only_platform().argv == daemon(holder.pid, eclipse=program)


@pytest.mark.parametrize("name", ["x;id>hit", "$(id>hit)", "`id>hit`", "x|id>hit", "a'b;id>hit;'", "x\nid>hit"])
def test_a_name_is_never_a_command(world, name):
    """The name stands in a shell's line, but only as what is searched for."""
    world.install("user", "eclipse.name=" + name.replace("\n", "\\u000a"))
    world.stand_in(BASE + "/linux/x86/" + name)
    holder = world.holder("/bin/sleep", "1000")
    world.write(LOCK, "%d          " % holder.pid)
    world.folder("/mnt/here")
    assert world.run(cwd="/mnt/here").status == 0
    assert os.listdir("/mnt/here") == []


# ---- the marker of a session that did not end cleanly

def test_the_marker_of_an_unclean_end_is_removed(world):
    world.install()
    world.write(WORKSPACE + "/.sid", "x")
    world.run()
    assert not os.path.exists(WORKSPACE + "/.sid")


def test_a_daemon_process_leaves_the_marker(world):
    """It belongs to the session that is running."""
    world.install()
    holder = world.holder(ECLIPSE)
    world.write(LOCK, "%d          " % holder.pid)
    world.write(WORKSPACE + "/.sid", "x")
    world.run()
    assert world.only_platform().argv == daemon(holder.pid)
    assert read(WORKSPACE + "/.sid") == "x"


@pytest.mark.parametrize("kind", ["folder", "closed"])
def test_a_marker_that_cannot_be_removed_or_read_changes_nothing(world, kind):
    world.install()
    path = world.folder(WORKSPACE + "/.sid") if kind == "folder" else world.write(WORKSPACE + "/.sid", "", 0)
    assert world.run().status == 0
    assert os.path.exists(path)
    assert world.only_platform().argv == main()


# ---- what can go wrong with the files

@pytest.mark.parametrize("kind, number, reason", [("folder", 21, "Is a directory"), ("closed", 13, "Permission denied")])
def test_a_lock_file_that_cannot_be_opened(world, kind, number, reason):
    """Two errors: that it could not be created, and then the fatal one."""
    world.install()
    if kind == "folder":
        world.folder(LOCK)
    else:
        world.write(LOCK, "", 0o400)
    world.fatal(world.run(), "QVMRL0054E: Error locating platform lock file", reason)
    assert read(temp_logs()[0]).splitlines()[-3:-1] == [
        "QVMRL0199E: CreateLockFile failed. errno=%d" % number,
        "QVMRL0054E: Error locating platform lock file : " + reason]


def test_a_workspace_in_which_no_lock_file_can_be_made(world):
    """The reason of the fatal error is that of the second attempt, which makes no file."""
    world.install()
    world.folder(WORKSPACE, 0o555)
    world.fatal(world.run(), "QVMRL0054E: Error locating platform lock file", "No such file or directory")
    assert "QVMRL0199E: CreateLockFile failed. errno=13\n" in read(temp_logs()[0])


def test_a_lock_that_the_system_refuses(world):
    world.install()
    start = world.run(strace=["-e", "trace=flock", "-e", "inject=flock:error=ENOLCK"])
    world.fatal(start, "QVMRL0053E: Error locking platform lock file. ", "No locks available")


def test_a_wait_for_the_lock_that_is_interrupted_goes_on(world):
    world.install()
    start = world.run(strace=["-e", "trace=flock", "-e", "inject=flock:error=EINTR:when=1..3"])
    assert start.status == 0
    assert world.only_platform().argv == main()
    assert read("/dev/shm/strace").count("flock(") == 5


def test_a_lock_that_cannot_be_released(world):
    """The platform has been started and recorded by then."""
    world.install()
    start = world.run(strace=["-e", "trace=flock", "-e", "inject=flock:error=EINVAL:when=2"])
    platform = world.only_platform()
    assert start.status == 255
    assert world.log().endswith(lines(
        "QVMRL0133I: ===== End Launch Parameters =====",
        "QVMRL0306I: lock file released @ <time>",
        "QVMRL0070E: Error unlocking platform lock file.  : Invalid argument"))
    assert read(LOCK) == "%d          " % platform.pid


def test_a_lock_file_that_cannot_be_written(world):
    """Told, and nothing more."""
    world.install()
    world.write(LOCK, "")
    start = world.run(strace=["-e", "trace=pwrite64", "-P", LOCK, "-e", "inject=pwrite64:error=ENOSPC"])
    platform = world.only_platform()
    assert start.status == 0
    assert read(LOCK) == ""
    assert read(MAIN) == "%d    " % platform.pid
    assert world.log().endswith(lines(
        "QVMRL0133I: ===== End Launch Parameters =====",
        "QVMRL0051E: Unable to write to platform lock file",
        "QVMRL0306I: lock file released @ <time>"))


def test_a_lock_file_that_cannot_be_written_for_a_moment(world):
    """Tried again: the next start has to find the platform."""
    world.install()
    world.write(LOCK, "")
    start = world.run(strace=["-e", "trace=pwrite64", "-P", LOCK, "-e", "inject=pwrite64:error=EIO:when=1"])
    platform = world.only_platform()
    assert start.status == 0
    assert "INJECTED" in read("/dev/shm/strace")
    assert read(LOCK) == "%d          " % platform.pid
    assert "QVMRL0051E" not in world.log()


def test_a_lock_file_that_takes_a_part_of_the_number(world):
    """A part is another number: told like a number that is not written."""
    world.install()
    world.write(LOCK, "")
    start = world.run(strace=["-e", "trace=pwrite64", "-P", LOCK, "-e", "inject=pwrite64:retval=3"])
    assert start.status == 0
    assert world.log().endswith(lines(
        "QVMRL0133I: ===== End Launch Parameters =====",
        "QVMRL0051E: Unable to write to platform lock file",
        "QVMRL0306I: lock file released @ <time>"))


def test_a_lock_file_that_is_there_is_not_made(world):
    """Where the system refuses to make what is another user's, it is still opened, and nothing is told."""
    world.install()
    world.write(LOCK, "4194303          ")
    start = world.run(strace=["-e", "trace=open,openat", "-P", LOCK])
    assert start.status == 0
    opened = [line for line in read("/dev/shm/strace").splitlines() if LOCK in line]
    assert len(opened) == 1 and "O_RDWR" in opened[0] and "O_CREAT" not in opened[0]


def test_the_position_of_the_lock_file_is_left_alone(world):
    """Its descriptor is the platform's, too. The number is read and written at the start of the file all the same."""
    world.install()
    world.write(LOCK, "  4194303          ")
    start = world.run(strace=["-y", "-e", "trace=lseek,_llseek,read,write", "-P", LOCK])
    platform = world.only_platform()
    assert start.status == 0
    assert read(LOCK) == ("%d          " % platform.pid).ljust(12) + "       "
    assert LOCK not in read("/dev/shm/strace")


@pytest.mark.parametrize("kind", ["folder", "closed"])
def test_a_pid_file_that_cannot_be_opened(world, kind):
    """Told whether traced or not; the lock file is written all the same."""
    world.install()
    if kind == "folder":
        world.folder(MAIN)
    else:
        world.write(MAIN, "old", 0o400)
    assert world.run().status == 0
    assert read(LOCK) == "%d          " % world.only_platform().pid
    assert world.log().endswith(lines(
        "QVMRL0133I: ===== End Launch Parameters =====",
        "QVMRL00XXI: Unable to open rcp.main file",
        "QVMRL0306I: lock file released @ <time>"))


def test_a_pid_file_that_cannot_be_written(world):
    world.install()
    world.write(MAIN, "old")
    start = world.run(strace=["-e", "trace=write", "-P", MAIN, "-e", "inject=write:error=ENOSPC"])
    assert start.status == 0
    assert read(MAIN) == ""
    assert read(LOCK) == "%d          " % world.only_platform().pid
    assert world.log().endswith(lines(
        "QVMRL0133I: ===== End Launch Parameters =====",
        "QVMRL00XXI: Unable to write pid to rcp.main file",
        "QVMRL0306I: lock file released @ <time>"))


def test_a_pid_file_is_written_anew(world):
    world.install()
    world.write(MAIN, "123456789 and more of it\n")
    world.run()
    assert read(MAIN) == "%d    " % world.only_platform().pid


def test_an_installer_may_not_run_while_a_platform_does(world):
    """It is refused before the configuration is made."""
    world.install()
    holder = world.holder(ECLIPSE)
    world.write(LOCK, "%d          " % holder.pid)
    world.fatal(world.run("-provManifest", "x"),
                "QVMRL0122E: Attempting to install while process %d is running." % holder.pid)
    assert not os.path.exists(CONFIG)
