"""Launchers that are killed: one for each call of the system by which a start changes what lies on the disk."""

import collections
import os
import re
import shutil

from world import read, until

CALLS = ["rename", "unlink", "mkdir", "rmdir", "write"]
TRACE = "/dev/shm/strace"
PRISTINE = "/dev/shm/pristine"
# "17 rename("/a", "/b") = 0", the call, and what it was given.
CALL = re.compile(r"^(\d+) +(\w+)\((.*)$")


class Interruptions:
    """Walks through the steps of one start: `for step in Interruptions(world, "/mnt/home", "-x")`. Each time, the
    folder is as it was in the beginning, and a launcher has just been killed at the step; what comes next is the
    test's. A step is told as the call with its arguments."""

    def __init__(self, world, folder, *words):
        self._world, self._folder, self._words = world, folder, words
        shutil.copytree(folder, PRISTINE, symlinks=True)

    def __iter__(self):
        for name, number, step in self._steps():
            start = self._run("-e", "inject=%s:signal=SIGKILL:when=%d" % (name, number))
            assert start.status == -9, step
            yield step

    def _steps(self):
        """The calls of an undisturbed start, those for the log excepted: name, its how manyth, the whole of it."""
        start = self._run()
        assert start.status == 0
        counted, steps = collections.Counter(), []
        for line in read(TRACE).splitlines():
            found = CALL.match(line)
            if not found or int(found.group(1)) != start.pid:
                continue
            _, name, given = found.groups()
            counted[name] += 1
            if not re.match(r"\d+<[^>]*/logs/velmora\.log>", given):
                steps.append((name, counted[name], line))
        assert {name for name, _, _ in steps} >= {"mkdir", "write"}
        return steps

    def _run(self, *how):
        for name in os.listdir(self._folder):
            path = os.path.join(self._folder, name)
            shutil.rmtree(path) if os.path.isdir(path) and not os.path.islink(path) else os.unlink(path)
        shutil.copytree(PRISTINE, self._folder, symlinks=True, dirs_exist_ok=True)
        start = self._world.run(*self._words, strace=["-y", "-e", "trace=" + ",".join(CALLS), *how])
        # The tracer ends after the launcher, and what a launcher has started before it was killed after that.
        until(lambda: not self._world.strangers(), "nothing of the start is left")
        return start
