"""What a start takes that is the same on every machine, or nearly: counted under strace and under callgrind.

A process counts as the launcher's own while it runs the launcher's program: the launcher itself, and its copies up to
their exec. What became the platform counts no further. Every other process is a helper.
"""

import glob
import os
import pathlib
import re

from startup_world import ECLIPSE, Failed, remove, watched

TRACE = "/dev/shm/trace"
PROFILE = "/dev/shm/profile"
LIBRARY = re.compile(r'open(?:at)?\(.*"([^"]*/[^"/]+\.so(?:\.[0-9]+)*)".* = [0-9]+')


def run(contestant, tool):
    """A start under a tool."""
    contestant.prepare()
    ended, _, failed = watched(contestant, [*tool, *contestant.command])[5:]
    if (ended, failed) != (contestant.status, 0):
        raise Failed("%s under %s: status %d, %d failed" % (contestant.name, tool[0], ended, failed))


def calls(contestant):
    """Counts the calls in a trace of all processes."""
    run(contestant, ["/usr/bin/strace", "-f", "-qq", "-o", TRACE])
    lines = [line.split(None, 1) for line in pathlib.Path(TRACE).read_text(errors="replace").splitlines()]
    # A call that was interrupted by another process's stands on two lines.
    lines = [(int(pid), text) for pid, text in lines if not text.startswith(("+++", "---"))]
    own, all_pids = {lines[0][0]: True}, {lines[0][0]}
    count, until_platform, with_helpers, libraries, platform = 0, None, 0, set(), None
    for pid, text in lines:
        all_pids.add(pid)
        if pid == platform:
            continue
        mine = own.setdefault(pid, True)
        whole = not text.startswith("<...")
        count, with_helpers = count + (whole and mine), with_helpers + whole
        found = LIBRARY.match(text)
        if mine and found:
            libraries.add(found.group(1))
        executed = re.match(r'execve\("([^"]*)"', text)
        if executed and pid != lines[0][0]:
            own[pid] = False
            if executed.group(1).endswith(ECLIPSE):
                platform, until_platform = pid, count
    if contestant.left and platform is None:
        raise Failed("%s under strace: no platform" % contestant.name)
    helpers = len(all_pids) - 1 - (platform is not None)
    return {"calls": count, "calls_until_platform": until_platform, "calls_with_helpers": with_helpers,
            "helpers": helpers, "libraries": sorted(libraries)}


def instructions(contestant):
    """Instructions outside of the kernel: of the processes that run the launcher's program, and of all of them.

    A copy of a process begins with the counters of the original, so they are put down and cleared before each fork.
    What a copy does between the fork and its exec is put down by nobody, and not counted.
    """
    run(contestant, ["/usr/bin/valgrind", "-q", "--tool=callgrind", "--trace-children=yes",
                     "--trace-children-skip=*/eclipse", "--dump-before=fork", "--dump-before=_Fork",
                     "--log-file=/dev/null", "--callgrind-out-file=" + PROFILE + ".%p"])
    own = every = 0
    for name in glob.glob(PROFILE + ".*"):
        text = pathlib.Path(name).read_text(errors="replace")
        total = re.search(r"^totals: (\d+)", text, re.M)
        command = re.search(r"^cmd: +(.*)", text, re.M)
        os.unlink(name)
        if not total or not command:
            raise Failed("%s under callgrind: a profile without a total" % contestant.name)
        every += int(total.group(1))
        if contestant.command[0] in command.group(1).split():
            own += int(total.group(1))
    if own == 0:
        raise Failed("%s under callgrind: no profile" % contestant.name)
    return {"instructions": own, "instructions_with_helpers": every}


def counted(contestant):
    found = {**calls(contestant), **instructions(contestant)}
    remove(TRACE)
    return found
