"""What a start writes, seen by its calls to the system: only where it may."""

import os

import pytest

import outside
from lab import EXIT_DATA, TRACE, Lab, hold_still
from scenarios import SCENARIOS, prepare
from world import APP, ECLIPSE, PROPERTIES, lines, read

# Opened for writing by everybody who wants nothing written.
NOWHERE = {"/dev/null", "/dev/tty"}


def _written(pieces, name, spoilt):
    """In a world: where the scenario's start, with the shells that it runs, wrote to or tried to."""
    hold_still()
    lab, scenario = Lab(pieces), SCENARIOS[name]
    prepare(lab, scenario)
    lab.no_plans()
    if name == "kiosk":
        lab.plan("write", EXIT_DATA, "shutdown")
    for path in spoilt:
        os.unlink(path)
    scenario.spoil(lab)
    before = outside.around()
    status, said = lab.run(*scenario.words, strace=outside.TRACED)
    return status, said, sorted(outside.writes(read(TRACE), ECLIPSE)), outside.changes(before)


@pytest.mark.parametrize("name", SCENARIOS)
def test_a_start_writes_only_where_it_may(in_a_world, name):
    """The user's area, the fixed names in /tmp; and .exitData, which a kiosk removes."""
    status, said, written, changes = in_a_world(_written, name, [])
    assert (status, said, changes) == (0, "", [])
    assert [path for path in written if not outside.may_be_written(path) and path not in NOWHERE] == []
    assert any(path.endswith("/logs/velmora.log") for path in written)
    assert (EXIT_DATA in written) == (name == "kiosk")


@pytest.mark.parametrize("spoilt", [PROPERTIES, APP + "/base/config.ini", APP + "/base/rcpinstall.properties"])
def test_a_start_that_fails_writes_only_where_it_may(in_a_world, spoilt):
    status, said, written, changes = in_a_world(_written, "first", [spoilt])
    assert (status, said, changes) == (255, "", [])
    assert [path for path in written if not outside.may_be_written(path) and path not in NOWHERE] == []
    assert any(path.endswith("velmora.log") for path in written)


def test_writes_elsewhere_are_seen():
    """Every way of writing; neither what is only read nor what the platform does."""
    trace = lines(
        '7     openat(AT_FDCWD</mnt>, "/a", O_RDONLY|O_CLOEXEC) = 3</a>',
        '7     openat(AT_FDCWD</mnt>, "/b", O_WRONLY|O_CREAT|O_TRUNC, 0666) = 3</b>',
        '7     mkdir("/c", 0775) = -1 EEXIST (File exists)',
        '7     mkdir("/d", 0775) = -1 EACCES (Permission denied)',
        '7     rename("/e", "/f" <unfinished ...>',
        '7     symlink("/text", "/g") = 0',
        '8     unlinkat(AT_FDCWD</mnt>, "h", 0) = 0',
        '7     <... rename resumed>) = 0',
        '8     fchmod(3</i>, 0600) = 0',
        '9     execve("%s", ["eclipse"], 0x1 /* 3 vars */ <unfinished ...>' % ECLIPSE,
        '9     <... execve resumed>) = 0',
        '9     mkdir("/j", 0777) = 0',
        '8     chmod("/k", 0777) = 0')
    assert sorted(outside.writes(trace, ECLIPSE)) == ["/b", "/d", "/e", "/f", "/g", "/i", "/k", "/mnt/h"]


def _changes_around(pieces):
    """In a world: what is found of changes that were made by hand."""
    hold_still()
    lab = Lab(pieces)
    prepare(lab, SCENARIOS["second"])
    before = outside.around()
    for path in ("/tmp/velmora.log", "/tmp/other", "/mnt/new", "/mnt/home/dot", "/mnt/home/VANTOR/RCP/free"):
        with open(path, "w"):
            pass
    with open(PROPERTIES, "a") as file:
        file.write("x")
    os.chmod(APP, 0o700)
    os.unlink(APP + "/base/config.ini")
    return outside.changes(before)


def test_changes_elsewhere_are_seen(in_a_world):
    assert in_a_world(_changes_around) == [
        "outside:" + path for path in ("/mnt/app", "/mnt/app/base/config.ini", PROPERTIES, "/mnt/home/dot", "/mnt/new",
                                       "/tmp/other")]
