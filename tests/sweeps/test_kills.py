"""Kills at moments at which no call of the launcher begins: it stands still, and its child runs."""

import os
import signal

import pytest

from lab import Lab, hold_still
from scenarios import SCENARIOS, mains, prepare
from world import LAUNCHER, executable, until

# Whoever executes a program waits a little before; the tracer is no child of the test.
SLOW_EXEC = ["-D", "-f", "-e", "trace=execve", "-e", "inject=execve:delay_enter=400000"]


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
    lab.records()[0].end()
    until(second.ended, "the other start has ended")
    return waited, alone, second.status, len(mains(lab.platforms()))


@pytest.mark.parametrize("name, strace", [("first", SLOW_EXEC), ("second", SLOW_EXEC), ("provisioning", None)],
                         ids=["first-before-the-exec", "second-before-the-exec", "while-it-provisions"])
def test_what_is_left_behind_keeps_the_lock(in_a_world, name, strace):
    """So the next start waits until it has ended, and becomes the main process then."""
    assert in_a_world(_killed_with_a_child, name, strace) == (True, True, 0, 2)
