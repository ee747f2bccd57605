"""The harness itself: a stand-in in the launcher's place shows what a world gives and what it keeps away."""

import os
import pathlib

import pytest

import namespaces
from world import APP, ECLIPSE, HOME, lines, read, tree, until


def test_starts_in_an_empty_world(world):
    assert tree("/mnt") == ["0755 home/"]
    assert tree("/tmp") == []
    assert world.strangers() == []


def test_records_what_a_start_was_given(world):
    world.stand_in("/mnt/x")
    start = world.run("a b", "", "\udcff", program="/mnt/x", argv0="name", env={"A": "1", "USER": None}, cwd="/tmp",
                      umask=0o027, closed=[0])
    platform = world.only_platform()
    assert start.status == 0
    assert platform.raw_argv == [b"name", b"a b", b"", b"\xff"]
    assert platform.env == {"A": "1", "HOME": "/mnt/home", "LC_ALL": "C.UTF-8", "PATH": "/usr/bin:/bin"}
    assert (platform.exe, platform.program) == ("/mnt/x", "/mnt/x")
    assert (platform.cwd, platform.umask) == ("/tmp", 0o027)
    assert sorted(platform.descriptors) == [1, 2]
    assert platform.status["Uid"].split() == ["1000"] * 4
    assert int(platform.status["CapEff"], 16) == 0


def test_a_stand_in_follows_the_plan_of_its_number(world):
    world.stand_in("/mnt/x")
    world.plan("write", "/tmp/a", "one", "append", "/tmp/a", " two", "sleep", 20, "exit", 7, start=0)
    world.plan("remove", "/tmp/a", "wait", "exit", 8)
    first = world.run(program="/mnt/x")
    assert (first.status, read("/tmp/a")) == (7, "one two")
    second = world.start(program="/mnt/x")
    platform = world.platform(1)
    assert platform.alive()
    until(lambda: not os.path.exists("/tmp/a"), "the second has removed the file")
    platform.end()
    assert second.wait().status == 8
    assert len(world.platforms()) == 2


def test_an_orphan_that_ends_is_gone(world):
    """A zombie would count as a living platform."""
    world.write("/mnt/x", "#!/bin/sh\nsleep 0.05 &\n", 0o755)
    world.run(program="/mnt/x")
    until(lambda: not world.strangers(), "nothing is left, not even a zombie")


def test_output_of_the_launcher_is_an_error(world):
    world.write("/mnt/x", "#!/bin/sh\necho told >&2\n", 0o755)
    with pytest.raises(AssertionError, match="told"):
        world.run(program="/mnt/x")


def test_a_launcher_that_stays_is_an_error(world):
    world.stand_in("/mnt/x")
    world.plan("wait")
    with pytest.raises(AssertionError, match="still running"):
        world.run(program="/mnt/x", within=0.2)


def test_a_holder_lives_until_it_is_ended(world):
    world.stand_in(ECLIPSE)
    holder = world.holder(ECLIPSE)
    os.kill(holder.pid, 0)
    assert world.platforms() == []
    world.end(holder)
    with pytest.raises(ProcessLookupError):
        os.kill(holder.pid, 0)


def test_calls_can_be_made_to_fail_and_the_tracer_is_no_parent(world):
    world.stand_in("/mnt/x")
    start = world.start(program="/mnt/x", strace=["-e", "trace=getcwd", "-e", "inject=getcwd:error=ENOENT"])
    assert start.wait().status == 0
    platform = world.only_platform()
    assert (platform.pid, platform.cwd) == (start.pid, "")


def test_an_ordinary_user_is_refused_what_modes_refuse(world):
    """The tests would show nothing if the launcher ran with privileges."""
    world.write("/mnt/x", "#!/bin/sh\ncat /mnt/secret 2>/dev/null\n", 0o755)
    world.write("/mnt/secret", "", 0o000)
    assert world.run(program="/mnt/x").status == 1


@pytest.mark.world(uid=0)
def test_the_world_of_the_administrator(world):
    world.stand_in("/mnt/x")
    world.run(program="/mnt/x")
    assert world.only_platform().status["Uid"].split() == ["0"] * 4


@pytest.mark.needs_root("only root starts a launcher as somebody else")
def test_somebody_else(world):
    world.stand_in("/mnt/x")
    world.run(program="/mnt/x", uid=1234)
    platform = world.only_platform()
    assert platform.status["Uid"].split() == ["1234"] * 4
    assert platform.status["Gid"].split() == ["1234"] * 4
    assert platform.status["Groups"].split() == []


def test_a_small_disk_is_full(world):
    world.small_disk("/mnt/small", 8192)
    world.write("/mnt/small/a", "x" * 4096)
    with pytest.raises(OSError, match="No space left"):
        world.write("/mnt/small/b", "x" * 8192)


def test_what_a_test_makes_is_not_seen_outside():
    def inside():
        pathlib.Path("/tmp/velmora-seen").write_text("x")
        pathlib.Path("/mnt/velmora-seen").write_text("x")
        return os.getpid()

    assert namespaces.isolated(inside, 1000, 20) == 2
    assert not os.path.exists("/tmp/velmora-seen")
    assert not os.path.exists("/mnt/velmora-seen")


def test_a_test_that_hangs_is_ended():
    with pytest.raises(namespaces.Hanging, match="not done after 0.3 seconds"):
        namespaces.isolated(lambda: os.read(os.pipe()[0], 1), 1000, 0.3)


def test_an_installation(world):
    world.install("service", "vm=/x")
    assert read(APP + "/rcp/velmora.properties") == lines(
        "rcp.install.id=abc", "rcp.base.location=${rcp.home}/base", "install.configuration=service", "vm=/x")
    assert tree(APP) == [
        "0755 base/",
        "0644 base/config.ini",
        "0755 base/linux/",
        "0755 base/linux/x86/",
        "0755 base/linux/x86/eclipse",
        "0644 base/platform.xml",
        "0644 base/rcpinstall.properties",
        "0755 rcp/",
        "0755 rcp/velmora",
        "0644 rcp/velmora.properties",
    ]
    assert os.stat(HOME).st_uid == os.stat(APP).st_uid == 1000
