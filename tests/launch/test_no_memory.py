"""Memory that comes to its end: status 255, and a line where there is memory enough for one."""

import collections
import os

import pytest

from world import LAUNCHER, read, temp_logs, user_logs

MEBIBYTE = 1 << 20


def bounded(world, mebibytes):
    """A start with so much memory at most."""
    if world.sanitized:
        pytest.skip("the address sanitizer needs more memory than any bound leaves")
    return world.run("--as=%d" % (mebibytes * MEBIBYTE), LAUNCHER, program="/usr/bin/prlimit")


def test_a_value_that_is_longer_than_memory(world):
    """No memory for that one; for the line there is."""
    world.install("user", "long=" + "x" * (16 * MEBIBYTE))
    start = bounded(world, 48)
    assert (start.status, world.platforms(), user_logs()) == (255, [], [])
    assert world.temp_log().endswith(
        "QVMRL0004E: newString malloc failed.  Failed with error 12: Cannot allocate memory\n\n")


def test_more_properties_than_memory(world):
    """Where none is left for the line either, only the status tells of it."""
    world.install("user", *("a%d=b" % number for number in range(1000000)))
    lines = collections.Counter()
    for mebibytes in range(12, 41, 2):
        start = bounded(world, mebibytes)
        assert (start.status, world.platforms(), user_logs()) == (255, [], []), mebibytes
        found = temp_logs()
        lines[len(found)] += 1
        for path in found:
            assert "\nQVMRL0004E: newString malloc failed. " in read(path), mebibytes
            os.unlink(path)
    assert set(lines) == {0, 1}


def test_a_directory_that_is_deeper_than_any(world):
    """What its levels take grows with their number, and no faster."""
    world.install("user")
    if world.sanitized:
        pytest.skip("the address sanitizer needs more memory than any bound leaves")
    deep = "/mnt/home" + 15000 * "/a"
    start = world.run("--as=%d" % (48 * MEBIBYTE), LAUNCHER, "-data", deep, program="/usr/bin/prlimit")
    assert (start.status, world.platforms()) == (255, [])
    log = world.temp_log()
    assert "\nQVMRL0083E: Unable to create /mnt/home/a/a/a/" in log
    assert "QVMRL0004E" not in log
