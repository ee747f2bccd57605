"""Crowds: many launchers at once on one workspace; and restart storms, while the old platform ends slowly or not at all."""

import fcntl
import os
import signal
import time

from lab import Lab, hold_still
from scenarios import FATAL, SCENARIOS, mains, prepare
from world import LOCK, LOG, WORKSPACE, read, read_bytes

SIZES = (2, 8, 32, 64)
AT_MOST = 25  # rounds in one world
# (launchers, whether the old platform ends, rounds)
STORMS = ((2, True, 5), (8, True, 5), (32, True, 5), (1, False, 1), (4, False, 1))
PATIENCE = 180


def parts(rounds_of_all):
    """The rounds, divided among worlds."""
    return [min(AT_MOST, rounds_of_all - done) for done in range(0, rounds_of_all, AT_MOST)]


def _lab(pieces, scenario):
    hold_still()
    lab = Lab(pieces)
    prepare(lab, SCENARIOS[scenario])
    return lab


def _all_ended(processes):
    deadline = time.monotonic() + PATIENCE
    for process in processes:
        if not process.ended(max(0.0, deadline - time.monotonic())):
            return False
    return True


def _judge(lab, processes, old):
    """What is wrong once all launchers have ended: among the new platforms there is one main process, which lives."""
    problems = []
    if not _all_ended(processes):
        problems.append("hang")
        lab.end_strangers()
        for process in processes:
            process.kill()
    well = len(processes)
    for process in processes:
        said = process.said()
        if process.status != 0 or said:
            rows = sorted({found.group() for found in map(FATAL.search, lab.last_lines()) if found})
            problems.append("end:%s %s%s" % (process.status, " ".join(rows), said))
            well -= 1
    new = lab.platforms()[old:]
    if len(new) != well:
        problems.append("platforms:%d" % len(new))
    found = mains(new)
    if len(found) != 1:
        return problems + ["mains:%d" % len(found)]
    number = str(found[0].pid)
    for platform in new:
        if platform is not found[0] and platform.argv[platform.argv.index("-useDaemon") + 1] != number:
            problems.append("daemon-names-another")
    if read(LOCK).rstrip(" ") != number or read(WORKSPACE + "/.rcp.main") != number + "    ":
        problems.append("short:.rcp.lock")
    with open(LOCK, "rb") as file:
        try:
            fcntl.flock(file, fcntl.LOCK_EX | fcntl.LOCK_NB)
        except BlockingIOError:
            problems.append("lock-left")
    if lab.snapshot() != lab.between:
        problems.append("files")
    if lab.history():
        problems.append("short:logs/shutdown.log")
    if b"\0" in read_bytes(LOG) or not read(LOG).startswith("QVMRL0030I: "):
        problems.append("mixed:logs/velmora.log")
    return sorted(set(problems))


def rounds(pieces, size, again, number):
    """In a world: so many rounds of so many launchers at once, in a new or in a grown user area."""
    lab, cases = _lab(pieces, "second" if again else "first"), []
    for _ in range(number):
        lab.reset()
        processes = [lab.start() for _ in range(size)]
        cases.append({"size": size, "again": again, "problems": _judge(lab, processes, 0)})
        lab.end_strangers()
    return cases


def storm(pieces, size, ends, number):
    """In a world: so many restarts at once, while the old platform takes its time to end, or never does."""
    lab, cases = _lab(pieces, "second"), []
    for _ in range(number):
        lab.reset()
        lab.plan("wait", "sleep", 700, start=0)
        lab.plan("wait", start=1)
        assert lab.run() == (0, "")
        old = lab.platforms()[0]
        words = ["-restart", "-rcp_old_pid", str(old.pid)]
        processes = [lab.start(*words) for _ in range(size)]
        if ends:
            processes[-1].ended(1.2)  # their first look is after a second
            os.kill(old.pid, signal.SIGTERM)
        case = {"size": size, "ends": ends, "problems": _judge(lab, processes, 1)}
        if old.alive():
            case["problems"].append("two-platforms")
        cases.append(case)
        lab.end_strangers()
    lab.plan("wait", start=0)
    return cases
