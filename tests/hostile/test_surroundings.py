"""A process environment that lacks what every session has."""

import ctypes
import os
import re

import pytest

import namespaces
from world import ECLIPSE, HEAD, INSTALL_AREA, LOCK, STARTUP, areas, system

DEFAULT_ARGV = HEAD + areas() + STARTUP + system() + INSTALL_AREA


def test_without_home(world):
    """The user's area would lie in the root directory, where the user may make none."""
    world.install()
    world.fatal(world.run(env={"HOME": None}),
                "QVMRL0083E: Unable to create /VANTOR/RCP/abc/anna directory.", "No such file or directory")


def test_without_user(world):
    world.install()
    world.fatal(world.run(env={"USER": None}), "QVMRL0037E: Couldn't find the user name!")


def test_without_path(world):
    """Neither a first start nor the process test beside a running platform needs it: the shell has one of its own."""
    world.install()
    world.plan("wait", start=0)
    assert world.run(env={"PATH": None}).status == 0
    platform = world.only_platform()
    assert platform.argv == DEFAULT_ARGV
    assert world.run(env={"PATH": None}).status == 0
    assert "-useDaemon" in world.platform(1).argv
    platform.end()


def test_without_any_variable(world):
    """Not even the locale: the C locale is one."""
    world.install()
    nothing = {name: None for name in ("HOME", "USER", "LC_ALL", "PATH")}
    assert world.run("-data", "/mnt/home/ws", env=nothing).status == 0
    assert world.only_platform().argv == HEAD + areas("/mnt/home/ws") + STARTUP + system("/mnt/home/ws") + INSTALL_AREA


@pytest.mark.parametrize("locale", ["xx_XX.UTF-8", "C.no-such-encoding", "/etc/passwd", "../../../../etc", "x" * 5000])
def test_a_locale_that_does_not_exist(world, locale):
    world.install()
    world.fatal(world.run(env={"LC_ALL": locale}), "QVMRL0182E: Set locale error!")


@pytest.mark.parametrize("home", ["", "/", "//", "relative", "/mnt/home" + ("/" + "m" * 200) * 25, "/mnt/home/" + "n" * 256,
                                  "/mnt/home/${rcp.home}", "/mnt/home/\xff", "/mnt/home/%n%s%1000000d"])
def test_a_strange_home(world, home):
    """A defined end, and a line in a log when it is a fatal one."""
    world.install()
    start = world.run(env={"HOME": home})
    assert start.status in (0, 255)
    if start.status == 255:
        assert world.temp_log().rstrip("\n").rpartition("\n")[2].startswith("QVMRL0083E: Unable to create ")
        assert world.platforms() == []
    else:
        world.only_platform()


@pytest.mark.parametrize("user", ["", ".", "..", "/", "a/b", "../../../../up", "n" * 256, ("/" + "m" * 200) * 25,
                                  "u" * 100000, "${rcp.home}", b"\xff", "%n%s%1000000d",
                                  "a b'c\"d$(touch /mnt/touched)`x`;\n"])
def test_a_strange_user(world, user):
    """A name in the path of the user's area: a defined end, a line in a log when it is a fatal one, and no command."""
    world.install()
    start = world.run(env={"USER": user})
    assert start.status in (0, 255)
    if start.status == 255:
        assert re.match("QVMRL[0-9]{4}E: ", world.temp_log().rstrip("\n").rpartition("\n")[2])
        assert world.platforms() == []
    else:
        world.only_platform()
        world.all_ended()
        assert world.run(env={"USER": user}).status == 0
    assert sorted(os.listdir("/mnt")) == ["app", "home"] + (["up"] if user == "../../../../up" else [])


@pytest.mark.parametrize("closed", [(0,), (1,), (2,), (0, 1), (1, 2), (0, 2), (0, 1, 2)])
def test_without_standard_descriptors(world, closed):
    """The launcher's files never take their places, and the platform finds something harmless there."""
    world.install()
    assert world.run(closed=closed).status == 0
    platform = world.only_platform()
    for number in closed:
        assert platform.descriptors[number] == "/dev/null"
    assert set(platform.descriptors) == {0, 1, 2, 3} and platform.descriptors[3] == LOCK


def test_without_proc(world):
    """The launcher cannot find itself."""
    if world.sanitized:
        pytest.skip("the address sanitizer does not work without /proc")
    world.install()
    libc = ctypes.CDLL(None, use_errno=True)
    with world.privileged():
        namespaces.mount("tmpfs", "/proc", "size=4096")
    start = world.start()
    start.wait()
    with world.privileged():
        assert libc.umount(b"/proc") == 0
    world.fatal(start, "QVMRL0184E: Getting command path failed! errno = 2", "No such file or directory")


def test_hardly_any_descriptors(world):
    """From none to plenty: a defined end each time, and with enough of them the platform starts."""
    if world.sanitized:
        pytest.skip("the address sanitizer does not work without descriptors")
    world.install()
    started = 0
    for limit in range(4, 16):
        script = world.write("/mnt/limited", '#!/bin/sh\nulimit -n %d\nexec /mnt/app/rcp/velmora "$@"\n' % limit, 0o755)
        status = world.run("-data", "/mnt/home/w%d" % limit, program=script).status
        assert status in (0, 255)
        world.platforms()
        world.all_ended()
        started += status == 0
    assert started >= 5


def test_a_platform_that_is_no_program(world):
    """It is executable by its mode alone; nothing starts, the log says why, and the next start with one works."""
    world.install()
    world.write(ECLIPSE, b"\x7fELF" + b"\0" * 100, 0o755)
    assert world.run().status == 0
    assert world.platforms() == []
    assert "Unable to execute %s : Exec format error\n" % ECLIPSE in world.log()
    world.stand_in(ECLIPSE)
    assert world.run().status == 0
    assert world.only_platform().argv == DEFAULT_ARGV


@pytest.mark.parametrize("content", [b"", b" " * 14, b"\0" * 20, b"99999999999999999999999999", b"-1          ",
                                     b"0          ", b"1          ", b"4711\xff\xfe", b"9" * (1 << 24)],
                         ids=lambda content: repr(content[:30]))
def test_a_strange_lock_file(world, content):
    """Whatever number it holds, the start is the main process or has its defined end, and the next one works."""
    world.install()
    world.write(LOCK, content)
    start = world.run()
    if content.startswith(b"\0"):
        assert start.status == 255
        log = world.temp_log().rstrip("\n").splitlines()
        assert log[-1].startswith("QVMRL0092E: Error reading platform lock file. : ")
        return
    assert start.status == 0
    assert world.only_platform().argv == DEFAULT_ARGV
    world.all_ended()
    assert world.run().status == 0
    assert len(world.platforms()) == 2
