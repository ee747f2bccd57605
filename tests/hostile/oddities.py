"""What can stand in the place of a file, and what a start makes of it."""

import os
import pathlib
import re

from world import APP, CONFIG, WORKSPACE, read, temp_logs, until, user_logs

CONFIG_INI = CONFIG + "/config.ini"
ARGS = CONFIG + "/args.properties"
UPDATE = CONFIG + "/org.eclipse.update"
PLATFORM_XML = UPDATE + "/platform.xml"
HISTORY = WORKSPACE + "/logs/shutdown.log"
JVM_PROPERTIES = APP + "/rcp/deploy/jvm.properties"
EXTENSION = APP + "/shared/eclipse/.eclipseextension"


def grown(world):
    """An installation with every file, and a user area in which a platform has run."""
    world.install()
    world.jvm_properties("vmarg.a=-Da=1")
    world.write(EXTENSION, "name=x\n")
    assert world.run().status == 0
    world.only_platform()
    world.all_ended()


def replace(path, what):
    """Puts something else in the place of the file."""
    os.makedirs(os.path.dirname(path), exist_ok=True)
    if os.path.lexists(path):
        os.unlink(path)
    if what == "fifo":
        os.mkfifo(path)
    elif what == "directory":
        os.mkdir(path)
        pathlib.Path(path, "inside").write_text("kept\n")
    elif what == "loop":
        os.symlink(path, path)
    elif what == "dangling":
        os.symlink("/mnt/nowhere/at/all", path)
    elif what == "null":
        os.symlink("/dev/null", path)
    elif what == "full":
        os.symlink("/dev/full", path)


def whole_log():
    """What all logs hold, held lines and time-stamped ones too."""
    return "".join(read(path) for path in user_logs() + temp_logs() if os.path.isfile(path))


def ends_as_promised(world, start, before=0):
    """Status 0 or 255; a fatal end has left its line as the last one of a log, and has started nothing."""
    assert start.status in (0, 255)
    started = len(world.platforms()) - before
    if start.status == 255:
        last_lines = [read(path).rstrip("\n").rpartition("\n")[2] for path in user_logs() + temp_logs()
                      if os.path.isfile(path)]
        assert any(re.match("QVMRL[0-9]{4}E: ", line) for line in last_lines), last_lines
        assert started == 0
    else:
        assert started == 1 or "Unable to execute " in whole_log()


def waits_in_open(start):
    """It sleeps in the kernel's open of a FIFO."""
    try:
        with open("/proc/%d/wchan" % start.pid) as file:
            return file.read() == "wait_for_partner"
    except FileNotFoundError:
        return False


def other_ends(start, path):
    """Opens the other end of the FIFO whenever the start waits for it: for what it reads a writer that has nothing to
    say, for what it writes a reader. Whether it ever waited; it has ended then."""
    waited = False
    while start.running():
        if waits_in_open(start):
            waited = True
            other = os.open(path, os.O_RDWR | os.O_NONBLOCK)
            until(lambda: not waits_in_open(start), "the open has come back")
            os.close(other)
    start.wait()
    return waited
