"""Something else where a directory of the user's area is expected, and where a reset looks for what it carries over."""

import os
import shutil

import pytest

from oddities import UPDATE, ends_as_promised, grown, other_ends, replace, whole_log
from world import CONFIG, HOME, WORKSPACE, read

EXIT_DATA = HOME + "/.exitData"
FOLDERS = [HOME + "/VANTOR", HOME + "/VANTOR/RCP/abc", WORKSPACE, CONFIG, WORKSPACE + "/logs", UPDATE,
           WORKSPACE + "/applications", WORKSPACE + "/applications/eclipse", WORKSPACE + "/.metadata"]


def remove(path):
    if os.path.isdir(path) and not os.path.islink(path):
        shutil.rmtree(path)
    elif os.path.lexists(path):
        os.unlink(path)


@pytest.mark.parametrize("what", ["file", "fifo", "loop", "dangling", "null"])
@pytest.mark.parametrize("path", FOLDERS)
def test_what_stands_in_the_place_of_a_folder(world, path, what):
    """A defined end, with its line; and once the place is free again, a start works."""
    grown(world)
    remove(path)
    if what == "file":
        world.write(path, "a file\n")
    else:
        replace(path, what)
    ends_as_promised(world, world.run(), before=1)
    world.all_ended()
    if what == "file" and os.path.isfile(path):
        assert read(path) == "a file\n"
    remove(path)
    before = len(world.platforms())
    assert world.run().status == 0, whole_log()
    assert len(world.platforms()) == before + 1


# ---- a reset

CARRIED = [UPDATE + "/registry", UPDATE + "/bookmarks.xml", WORKSPACE + "/registry.old",
           WORKSPACE + "/bookmarks.xml.old"]


@pytest.mark.parametrize("what", ["directory", "loop", "dangling", "null", "fifo"])
@pytest.mark.parametrize("path", [*CARRIED, CONFIG + "bak", CONFIG + "bakdeleteme0001"])
def test_what_a_reset_finds(world, path, what):
    """A defined end, with its line; and the next start works."""
    grown(world)
    for name in CARRIED[:2]:
        world.write(name, "kept\n")
    remove(path)
    replace(path, what)
    start = world.start("-resetconfig")
    if what == "fifo":
        # Only what is read is waited for; what is written is opened for reading too, as it always was.
        assert other_ends(start, path) == (path in CARRIED[:2])
    start.wait()
    ends_as_promised(world, start, before=1)
    world.all_ended()
    before = len(world.platforms())
    for name in CARRIED:
        remove(name)
    assert world.run().status == 0, whole_log()
    assert len(world.platforms()) == before + 1


# ---- a kiosk

def test_a_fifo_that_the_platform_leaves_as_its_word(world):
    """It is read like a file: the launcher waits for somebody who writes the word."""
    world.install("lockdown")
    world.plan("wait")
    start = world.start()
    platform = world.platform()
    os.mkfifo(EXIT_DATA)
    platform.end()
    writer = os.open(EXIT_DATA, os.O_WRONLY)  # comes back when the launcher reads
    os.write(writer, b"bye")
    os.close(writer)
    assert start.wait().status == 0
    assert len(world.platforms()) == 1


@pytest.mark.parametrize("text", ["x" * (1 << 20), "shutdown" + "\0" * (1 << 20), "logoff" * 200000])
def test_a_word_of_a_mebibyte(world, text):
    """The first 1023 bytes, up to a zero byte, are the word. An unknown one ends the supervision; a shutdown ends the
    session, here without a library for it."""
    world.install("lockdown")
    world.write("/mnt/bin/killall", "#!/bin/sh\n", 0o755)
    world.write("/mnt/word", text)
    world.plan("wait")
    start = world.start(env={"PATH": "/mnt/bin:/usr/bin:/bin"})
    platform = world.platform()
    os.rename("/mnt/word", EXIT_DATA)
    platform.end()
    assert start.wait().status == (1 if text.startswith("shutdown") else 0)
    assert len(world.platforms()) == 1
