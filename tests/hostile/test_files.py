"""Something else where a file is expected: FIFOs, directories, links, and file systems that take nothing."""

import os

import pytest

import namespaces
from oddities import (ARGS, CONFIG_INI, EXTENSION, HISTORY, JVM_PROPERTIES, PLATFORM_XML, ends_as_promised, grown,
                      other_ends, replace, whole_log)
from world import (APP, BASE, ECLIPSE, HOME, LOCK, LOG, MAIN, PROPERTIES, TEMP_LOG, USER_PROPERTIES, WORKSPACE, read,
                   tree, until)

MARKER = APP + "/rcp/prov.debug/debug.txt"
SID = WORKSPACE + "/.sid"

# Every file that a start reads, writes or asks for.
FILES = [PROPERTIES, MARKER, LOCK, SID, LOG, TEMP_LOG, EXTENSION, WORKSPACE + "/applications/eclipse/.eclipseextension",
         ARGS, CONFIG_INI, BASE + "/config.ini", USER_PROPERTIES, BASE + "/rcpinstall.properties", JVM_PROPERTIES,
         PLATFORM_XML, BASE + "/platform.xml", HISTORY, MAIN, ECLIPSE]

# Only these: a device that never comes to an end is read for ever, as a file would be.
WRITTEN = [LOG, TEMP_LOG, ARGS, HISTORY, MAIN]
# It is there, so the start waits until it is gone; see the test of the FIFO.
STAYS = (MARKER, "directory")


@pytest.mark.parametrize("path, what", [
    *((path, what) for path in FILES for what in ("directory", "loop", "dangling", "null") if (path, what) != STAYS),
    *((path, "full") for path in WRITTEN),
])
def test_what_stands_in_the_place_of_a_file(world, path, what):
    """No crash, no hang, nothing printed; and once the file's place is free again, a start works."""
    grown(world)
    replace(path, what)
    if path == MARKER and what == "null":
        start = world.start()
        until(lambda: "QVMRL0303I" in whole_log(), "the log is open")
        os.unlink(path)
        start.wait()
    else:
        start = world.run()
    ends_as_promised(world, start, before=1)
    world.all_ended()
    if what == "directory" and os.path.isdir(path):
        assert read(path + "/inside") == "kept\n"
    if os.path.islink(path):
        os.unlink(path)
    elif os.path.isdir(path):
        os.unlink(path + "/inside")
        os.rmdir(path)
    if path == USER_PROPERTIES and what == "null":
        assert start.status == 255  # an empty copy is believed until somebody removes it
    if path.startswith(APP):
        world.install()
        world.jvm_properties("vmarg.a=-Da=1")
    before = len(world.platforms())
    assert world.run().status == 0, whole_log()
    assert len(world.platforms()) == before + 1


# ---- FIFOs: opening one waits for its other end

WAITS = {PROPERTIES, EXTENSION, ARGS, USER_PROPERTIES, JVM_PROPERTIES, HISTORY}
INSTALLED = [PROPERTIES, EXTENSION, JVM_PROPERTIES, BASE + "/config.ini", BASE + "/rcpinstall.properties",
             BASE + "/platform.xml"]


@pytest.mark.parametrize("path", [path for path in FILES if path != LOCK])
def test_a_fifo_in_the_place_of_a_file(world, path):
    """Reading or writing one waits until somebody opens the other end, and the start goes on then. Whether one is there
    is asked without waiting. Never does it hang for another reason."""
    grown(world)
    replace(path, "fifo")
    start = world.start()
    if path == MARKER:
        until(lambda: "QVMRL0303I" in whole_log(), "the log is open")
        os.unlink(path)  # while it is there, the start waits for its removal
    assert other_ends(start, path) == (path in WAITS)
    ends_as_promised(world, start, before=1)


@pytest.mark.parametrize("path", INSTALLED)
def test_a_fifo_in_the_installation_on_a_first_start(world, path):
    """What the user's files are made from is read."""
    world.install()
    world.jvm_properties("vmarg.a=-Da=1")
    world.write(EXTENSION, "name=x\n")
    replace(path, "fifo")
    start = world.start()
    assert other_ends(start, path)
    ends_as_promised(world, start)


def test_a_fifo_in_the_place_of_the_lock_file(world):
    """It has no start to read the number at: refused, and nobody waits."""
    grown(world)
    replace(LOCK, "fifo")
    assert world.run().status == 255
    assert world.temp_log().rstrip("\n").rpartition("\n")[2] == (
        "QVMRL0092E: Error reading platform lock file. : Illegal seek")


# ---- file systems

def test_a_read_only_home(world):
    """The user's area cannot be made; the line is in /tmp."""
    world.install()
    world.small_disk(HOME, 1 << 16)
    with world.privileged():
        namespaces.mount("", HOME, source="none", flags=0x20 | 0x1)  # remount, read-only
    world.fatal(world.run(), "QVMRL0083E: Unable to create %s directory." % WORKSPACE, "No such file or directory")
    assert tree(HOME) == []


def test_a_read_only_user_area(world):
    """It exists already, but the lock file cannot be opened for writing."""
    world.install()
    world.small_disk(HOME, 1 << 20)
    assert world.run().status == 0
    world.only_platform()
    world.all_ended()
    before = tree(HOME)
    with world.privileged():
        namespaces.mount("", HOME, source="none", flags=0x20 | 0x1)
    start = world.run()
    assert start.status == 255
    assert len(world.platforms()) == 1
    log = world.temp_log().rstrip("\n").splitlines()
    assert log[-1] == "QVMRL0054E: Error locating platform lock file : Read-only file system"
    assert "QVMRL0199E: CreateLockFile failed. errno=30" in log
    assert tree(HOME) == before


@pytest.mark.parametrize("inodes", range(2, 26))
def test_a_file_system_without_room_for_more_files(world, inodes):
    """At every number of files that still have room: a defined end, its line in a log, and with room a start works."""
    world.install()
    world.folder(HOME)
    with world.privileged():
        namespaces.mount("tmpfs", HOME, "mode=0755,uid=%d,gid=%d,nr_inodes=%d" % (world.uid, world.uid, inodes))
    ends_as_promised(world, world.run())
    world.platforms()
    world.all_ended()
    with world.privileged():
        namespaces.mount("", HOME, "nr_inodes=200", source="none", flags=0x20)
    before = len(world.platforms())
    assert world.run().status == 0, whole_log()
    assert len(world.platforms()) == before + 1


@pytest.mark.parametrize("pages", range(1, 12))
def test_a_file_system_without_room_for_more_bytes(world, pages):
    """A defined end, with its line in a log that can still be written; the log in the user's area may be cut."""
    world.install()
    world.small_disk(HOME, pages * 4096)
    start = world.run()
    assert start.status in (0, 255)
    world.platforms()


# ---- what a start writes

def test_nothing_else_is_written(world):
    """Outside the user's area, the fixed names in /tmp and the log: nothing, whatever the start is."""
    world.install("user", "provisioning=true", "provisioning.manifest.version=1", "provisioning.application=p")
    world.base_properties("resetDir.a=state", "library.preload=" + world.write(APP + "/a library/libx.so"))
    outside = {top: (tree(top), {path: read(path) for path in files_below(top)}) for top in (APP, "/mnt")}
    for words in ([], ["-debug"], ["-resetconfig"], ["-console"], ["-config", "none"]):
        assert world.run(*words).status == 0
        world.platforms()
        world.all_ended()
    assert sorted(os.listdir("/tmp")) == ["vantor.rcp.anna.abc.libx.so"]
    assert tree(APP) == outside[APP][0]
    assert {path: read(path) for path in files_below(APP)} == outside[APP][1]
    assert sorted(os.listdir("/mnt")) == ["app", "home"]
    assert os.listdir(HOME) == ["VANTOR"]


def files_below(top):
    return [os.path.join(folder, name) for folder, _, names in os.walk(top) for name in names
            if not folder.startswith(HOME)]
