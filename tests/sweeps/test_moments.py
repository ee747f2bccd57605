"""Moments that no sweep meets by itself: the launcher stands still, and its child or another launcher goes on."""

import os
import signal
import time

import pytest

import sweeps
from lab import TRACE, Lab, hold_still
from scenarios import SCENARIOS, mains, prepare
from world import LAUNCHER, LOCK, LOG, WORKSPACE, executable, read, read_bytes, until

# Whoever executes a program waits a little before; the tracer is no child of the test.
SLOW_EXEC = ["-D", "-f", "-e", "trace=execve", "-e", "inject=execve:delay_enter=1500000"]


def _killed_with_a_child(pieces, name, strace):
    """In a world: the launcher is killed, another start comes, then the platform that was left behind ends.

    (whether the other start waited at once, whether it did so until the platform ended, its status, and how many
    platforms became the main one)"""
    hold_still()
    lab = Lab(pieces)
    prepare(lab, SCENARIOS[name])
    lab.reset()
    lab.plan("wait", start=0)
    first = lab.start(strace=strace)
    if strace:
        until(lambda: [pid for pid in lab.strangers() if pid != first.pid and executable(pid) == LAUNCHER],
              "there is a child, which is no platform yet")
    else:
        until(lab.records, "the child runs")
    os.kill(first.pid, signal.SIGKILL)
    assert first.ended(20) and first.status == -signal.SIGKILL
    second = lab.start()
    until(lambda: second.ended() or lab.waits_for_lock(second), "the other start waits")
    waited = not second.ended()
    until(lab.records, "the child runs")
    alone = len(lab.records()) == 1 and not second.ended()
    lab.end_behind(second)
    until(second.ended, "the other start has ended")
    return waited, alone, second.status, len(mains(lab.platforms()))


def _workspace_made_meanwhile(pieces):
    """In a world: a first start, and somebody who makes its workspace after it has found none."""
    hold_still()
    lab, scenario = Lab(pieces), SCENARIOS["first"]
    prepare(lab, scenario)
    calls = [call for call in sweeps.list_calls_of(lab, scenario) if call.name == "mkdir"]
    last = [call for call in calls if call.path() == WORKSPACE][-1]
    lab.reset()
    delay = "inject=mkdir:delay_enter=2000000:when=%d" % last.number
    start = lab.start(strace=["-e", "trace=mkdir", "-e", delay])
    until(lambda: os.path.isdir(os.path.dirname(WORKSPACE)), "it makes the folders above")
    os.mkdir(WORKSPACE)
    until(start.ended, "it has ended")
    lines = lab.last_lines()
    return start.status, [line.partition(" : ")[0] for line in lines], lab.run()[0]


def test_a_workspace_that_another_start_makes_meanwhile(in_a_world):
    """Of several first starts at once each comes to the lock, whoever makes the folders."""
    status, _, next_status = in_a_world(_workspace_made_meanwhile)
    assert (status, next_status) == (0, 0)


def _log_shared(pieces):
    """In a world: a launcher that is about to write its last line, and another one that begins the log anew."""
    hold_still()
    lab, scenario = Lab(pieces), SCENARIOS["first"]
    prepare(lab, scenario)
    last = [call for call in sweeps.list_calls_of(lab, scenario) if call.name == "write" and call.path() == LOG][-1]
    lab.reset()
    delay = "inject=write:delay_enter=2000000:when=%d" % last.number
    first = lab.start(strace=["-e", "trace=write", "-e", delay])
    platform = until(lab.records, "the platform runs")[0]
    until(lambda: read(LOCK).startswith("%d " % platform.pid), "it is recorded")
    place = len(read_bytes(LOG))
    second = lab.run()
    until(first.ended, "the first one has written its last line")
    return first.status, second, read_bytes(LOG)[place:place + 32]


def test_a_log_that_another_launcher_begins_anew(in_a_world):
    """Required as it is: the last line comes after the lock was released, and stands where the first log ended."""
    assert in_a_world(_log_shared) == (0, (0, ""), b"QVMRL0306I: lock file released @")


def _no_shell_at_once(pieces):
    """In a world: a start beside a platform, which is refused a child when it wants to run the shell."""
    hold_still()
    lab = Lab(pieces)
    prepare(lab, SCENARIOS["daemon"])
    lab.reset()
    began = time.monotonic()
    refused = lab.run(strace=["-e", "trace=clone,clone3,vfork", "-e", "inject=clone,clone3,vfork:error=EAGAIN:when=1"])
    assert "EAGAIN" in read(TRACE)
    return refused, time.monotonic() - began >= 1, [platform.argv for platform in mains(lab.platforms())]


def test_a_shell_that_cannot_be_had_at_once(in_a_world):
    """It is asked for again after a second; the platform is not taken for gone."""
    assert in_a_world(_no_shell_at_once) == ((0, ""), True, [])


@pytest.mark.parametrize("name, strace", [("first", SLOW_EXEC), ("second", SLOW_EXEC), ("provisioning", None)],
                         ids=["first-before-the-exec", "second-before-the-exec", "while-it-provisions"])
def test_what_is_left_behind_keeps_the_lock(in_a_world, name, strace):
    """So the next start waits until it has ended, and becomes the main process then."""
    assert in_a_world(_killed_with_a_child, name, strace) == (True, True, 0, 2)
