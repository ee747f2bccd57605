"""What others have put into /tmp, where everybody writes; and a /tmp that takes nothing."""

import os
import pathlib

import pytest

import namespaces
from world import APP, HOME, LOG, PROPERTIES, TEMP_LOG, read, temp_logs, tree

EXIT_DATA = HOME + "/.exitData"
REQUEST = "/tmp/tzn_shutdown"


@pytest.mark.needs_root("files of another user")
@pytest.mark.parametrize("what", ["link", "file", "directory"])
@pytest.mark.parametrize("ends", ["well", "badly"])
def test_the_name_of_the_log_in_tmp_is_taken(world, what, ends):
    """By another user. Neither the start nor its fatal end depends on it; what a link of another one leads to is written
    only where the system allows to follow it and the user may write there."""
    world.install()
    victim = world.write("/mnt/victim", "precious\n")
    if what == "link":
        world.link(TEMP_LOG, victim)
    elif what == "file":
        world.write(TEMP_LOG, "theirs\n", 0o644)
    else:
        world.folder(TEMP_LOG)
    world.give(TEMP_LOG, 2000)
    if ends == "badly":
        world.properties("rcp.install.id=abc")
    start = world.run()
    assert start.status == (0 if ends == "well" else 255)
    follows = pathlib.Path("/proc/sys/fs/protected_symlinks").read_text() == "0\n"
    if what == "link" and follows and ends == "badly":
        # The line of the fatal end: what the required open of that name writes.
        assert read(victim).rstrip("\n").rpartition("\n")[2].startswith("QVMRL0050E: ")
    else:
        assert read(victim) == "precious\n"
    if what == "file":
        assert read(TEMP_LOG) == "theirs\n"
    assert os.path.lexists(TEMP_LOG)  # only its owner can remove it from there


@pytest.mark.needs_root("files of another user")
@pytest.mark.parametrize("what", ["link", "file"])
def test_the_name_of_the_preload_link_is_taken(world, what):
    """By another user, who thereby keeps the user from the library: LD_PRELOAD names the other one's link, as required,
    and a plain file there ends every start."""
    world.install()
    library = world.write(APP + "/a library/libx.so", "no library\n")
    world.base_properties("library.preload=" + library)
    link = "/tmp/vantor.rcp.anna.abc.libx.so"
    if what == "link":
        world.link(link, world.write("/mnt/theirs.so", "no library\n"))
    else:
        world.write(link, "no library\n")
    world.give(link, 2000)
    start = world.run()
    if what == "file":
        world.fatal(start, "QVMRL0184E: Getting command path failed! errno = 22", "Invalid argument")
        return
    assert start.status == 0
    assert world.only_platform().env["LD_PRELOAD"] == link
    assert os.readlink(link) == "/mnt/theirs.so"


@pytest.mark.needs_root("files of another user")
@pytest.mark.parametrize("owner", [1000, 2000])
def test_a_fifo_in_the_place_of_the_log_in_tmp(world, owner):
    """Neither a start that works nor a fatal end waits for somebody who reads it."""
    world.install()
    os.mkfifo(TEMP_LOG, 0o666)
    os.chmod(TEMP_LOG, 0o666)
    world.give(TEMP_LOG, owner)
    assert world.run().status == 0
    world.only_platform()
    world.all_ended()
    assert os.path.exists(TEMP_LOG) == (owner == 2000)  # the user's own is removed, as any old log there
    if owner == 1000:
        os.mkfifo(TEMP_LOG, 0o600)
    world.properties("rcp.install.id=abc")
    assert world.run("-data", "/mnt/home/other").status == 255
    assert len(world.platforms()) == 1


@pytest.mark.needs_root("files of another user")
@pytest.mark.parametrize("what", ["link", "file", "directory", "fifo", "dangling"])
def test_the_name_of_the_request_for_a_shutdown_is_taken(world, what):
    """By another user. The kiosk goes on: with the request where it can be written, else with the platform again."""
    world.install("lockdown")
    world.write("/mnt/bin/killall", "#!/bin/sh\n", 0o755)
    victim = world.write("/mnt/victim", "precious\n")
    if what == "link":
        world.link(REQUEST, victim)
    elif what == "dangling":
        world.link(REQUEST, "/var/made")
    elif what == "file":
        world.write(REQUEST, "theirs\n", 0o644)
    elif what == "fifo":
        os.mkfifo(REQUEST, 0o644)
    else:
        world.folder(REQUEST)
    world.give(REQUEST, 2000)
    world.plan("write", EXIT_DATA, "shutdown", start=0)
    world.plan("write", EXIT_DATA, "bye", start=1)
    start = world.run(env={"PATH": "/mnt/bin:/usr/bin:/bin"})
    follows = pathlib.Path("/proc/sys/fs/protected_symlinks").read_text() == "0\n"
    if what == "link" and follows:
        # The request: what the required open of that name writes. Without a session library the kiosk ends there.
        assert start.status == 1
        assert read(victim).startswith("shutdown\0")
        return
    assert start.status == 0
    assert len(world.platforms()) == 2
    assert read(victim) == "precious\n"
    assert what != "file" or read(REQUEST) == "theirs\n"


@pytest.mark.needs_root("files of another user")
def test_every_name_is_taken(world):
    """By directories of another user: a fatal end is told by its status alone, and a start that works is none the
    worse."""
    world.install()
    for name in (TEMP_LOG, REQUEST, "/tmp/vantor.rcp.anna.abc.libx.so"):
        world.folder(name)
        world.give(name, 2000)
    world.base_properties("library.preload=" + world.write(APP + "/lib/libx.so", ""))
    assert world.run().status == 0
    world.only_platform()
    world.all_ended()
    os.unlink(PROPERTIES)
    assert world.run().status == 255
    assert len(world.platforms()) == 1


@pytest.mark.parametrize("options, flags", [("size=4096", 0), ("nr_inodes=1", 0), ("", 1)],
                         ids=["full of bytes", "full of files", "read-only"])
def test_a_tmp_that_takes_nothing(world, options, flags):
    """A start that works needs no /tmp. A fatal end says in it what it can: nothing, or as much as there is room for."""
    world.install()
    with world.privileged():
        namespaces.mount("tmpfs", "/tmp", ",".join(filter(None, ["mode=1777", options])), flags=flags)
    assert world.run().status == 0
    world.only_platform()
    world.all_ended()
    assert os.path.exists(LOG)
    os.unlink(PROPERTIES)
    before = tree(HOME)
    assert world.run("x" * 100000).status == 255
    assert len(world.platforms()) == 1
    assert tree(HOME) == before
    assert len(temp_logs()) == (1 if options.startswith("size") else 0)
