"""A launcher that is killed half-way: the files that are made once and believed for ever are whole, or not there."""

import os

import pytest

from world import BASE, lines, read, temp_logs

CONFIG_INI = "a=1\n" * 20
BASE_LINES = ["key%d=value" % number for number in range(10)]
BLOCK = ["rcp.install.id=abc", "rcp.base.location=${rcp.home}/base", "install.configuration=user"]
TEMPLATE = "<site/>\n" * 10


@pytest.mark.parametrize("call", ["write", "rename", "unlink", "fsync", "close", "openat"])
def test_the_next_start_finds_nothing_half_made(world, call):
    """Killed at the first such call, at the second one, and so on, until a start gets through. The next start in the
    same user area makes whatever is missing, and leaves all of it as it should be."""
    world.install()
    world.write(BASE + "/config.ini", CONFIG_INI)
    world.base_properties(*BASE_LINES)
    world.write(BASE + "/platform.xml", TEMPLATE)
    step = {"write": 3, "close": 3, "openat": 3}.get(call, 1)
    killed, number, status = 0, 1, None
    while status != 0:
        workspace = "/mnt/w%d" % number
        status = world.run("-data", workspace, strace=[
            "-e", "trace=" + call, "-e", "inject=%s:signal=KILL:when=%d" % (call, number)]).status
        assert status in (0, -9)
        killed += status == -9
        world.all_ended()
        assert world.run("-data", workspace).status == 0
        world.all_ended()
        config = workspace + "/.config/"
        assert read(config + "config.ini") == CONFIG_INI, number
        assert read(config + "rcpinstall.properties") == lines(*BASE_LINES, *BLOCK), number
        assert read(config + "org.eclipse.update/platform.xml") == TEMPLATE, number
        number += step
    assert killed >= 1
    assert temp_logs() == [] and os.path.isdir("/mnt/w1")
