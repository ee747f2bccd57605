"""What the sweeps rest on: that they see the launcher's calls, and that they would see it fail."""

import os

import pytest

import memory
import named
import sweeps
from lab import Lab, hold_still
from scenarios import SCENARIOS, judge_end, judge_files, prepare
from world import CONFIG, WORKSPACE, read


def _calls_behind_the_mark(pieces):
    """In a world: the system's calls from the moment when main is called."""
    hold_still()
    lab = Lab(pieces)
    prepare(lab, SCENARIOS["first"])
    lab.reset()
    with open(memory.LIBRARY, "wb") as file:
        file.write(pieces["no_memory"])
    words = ["-e", "signal=none", "-E", "LD_PRELOAD=" + memory.LIBRARY, "-E", "NO_MEMORY_AT=1000000000",
             "-E", "NO_MEMORY_NOTE=" + memory.NOTE]
    assert lab.run(strace=words) == (0, "")
    lines = read("/dev/shm/trace").splitlines()
    mark = next(number for number, line in enumerate(lines) if line.startswith("getpgid(-424242)"))
    return lines[:mark], lines[mark + 1:]


@pytest.mark.usefixtures("takes_a_library")
def test_the_beginning_of_main_is_seen(in_a_world):
    """A library that calls main in the C library's stead leaves a mark: the first call after it is the one that counts
    as the first of main, and none before it looks like that."""
    before, after = in_a_world(_calls_behind_the_mark)
    assert sweeps.MAIN_BEGINS.match(after[0])
    assert not any(sweeps.MAIN_BEGINS.match(line) for line in before)


def test_the_calls_are_counted_as_strace_counts_them():
    """From the beginning of the process, each name for itself."""
    calls = sweeps.launcher_calls(
        'openat(AT_FDCWD, "/etc/ld.so.cache", O_RDONLY|O_CLOEXEC) = 3\n'
        'close(3)                                = 0\n'
        'brk(NULL)                               = 0x5000\n'
        'rt_sigaction(SIGCHLD, {sa_handler=SIG_DFL, sa_mask=[CHLD], sa_flags=SA_RESTART}, NULL, 8) = 0\n'
        'openat(AT_FDCWD, "/mnt/b", O_RDWR)      = 3</mnt/b>\n'
        'close(3</mnt/b>)                        = 0\n'
        'brk(0x6000)                             = 0x6000\n'
        'openat(AT_FDCWD, "/mnt/a", O_RDWR|O_CREAT, 0600) = 3</mnt/a>\n'
        '+++ exited with 0 +++\n')
    assert [(call.name, call.number, call.path()) for call in calls] == [
        ("rt_sigaction", 1, ""), ("openat", 2, "/mnt/b"), ("close", 2, "/mnt/b"), ("brk", 2, ""),
        ("openat", 3, "/mnt/a")]
    assert calls[3].injection("ENOMEM")[-1] == "inject=brk:retval=0x5000:when=2"
    assert calls[2].injection("EIO")[-1] == "inject=close:error=EIO:when=2"
    assert calls[4].injection("KILL")[-1] == "inject=openat:signal=KILL:when=3"
    assert calls[4].injection("EIO", lasting=True)[-1] == "inject=openat:error=EIO:when=3+"
    assert "ENOSPC" in calls[4].errors() and "EMFILE" in calls[4].errors()
    assert calls[0].errors() == []


class Finished:
    """A lab after a start that left these last lines."""

    def __init__(self, *last_lines):
        self._last_lines = last_lines

    def last_lines(self):
        return self._last_lines

    def platforms(self):
        return ["one"]


@pytest.mark.parametrize("status, said, last_line, problems", [
    (0, "", "QVMRL0306I: lock file released @ x", []),
    (255, "", "QVMRL0083E: Unable to create /x directory. : Permission denied", []),
    (255, "", "QVMRL0306I: lock file released @ x", ["silent"]),
    (255, "", "", ["silent"]),
    (1, "", "", ["status:1"]),
    (-11, "", "QVMRL0083E: x", ["signal:11"]),
    (-6, "", "", ["signal:6"]),
    ("hang", "", "", ["hang"]),
    (0, "free(): invalid pointer", "", ["said:free(): invalid pointer"]),
])
def test_ends_that_are_not_as_promised_are_seen(status, said, last_line, problems):
    assert judge_end(Finished(last_line), SCENARIOS["first"], status, said)[0] == problems


def test_problems_are_failures_unless_they_are_named():
    """A named problem counts only where its name says, and never hides another one."""
    case = {"scenario": "first", "call": "write", "path": WORKSPACE + "/.rcp.lock",
            "lines": ["QVMRL0051E", "QVMRL0090E"], "problems": ["two-platforms"]}
    named.judge("errors", case)
    assert (case["verdict"], case["named"]) == ("named", ["number-not-recorded"])
    for other in (dict(case, call="flock"), dict(case, path=WORKSPACE + "/.pipe"),
                  dict(case, lines=["QVMRL0090E"]), dict(case, problems=["two-platforms", "signal:11"]), dict(case, problems=["silent"])):
        named.judge("errors", other)
        assert other["verdict"] == "failed"
    named.judge("kills", case)
    assert case["verdict"] == "failed"


def _damaged(pieces):
    """In a world: what is found after files have been damaged by hand."""
    hold_still()
    lab, scenario = Lab(pieces), SCENARIOS["second"]
    prepare(lab, scenario)
    found = [judge_files(lab)]
    with open(CONFIG + "/config.ini", "w") as file:
        file.write("osgi.bun")
    os.unlink(CONFIG + "/rcpinstall.properties")
    with open(WORKSPACE + "/.config/extra", "w") as file:
        file.write("x")
    with open(WORKSPACE + "/logs/shutdown.log", "a") as file:
        file.write("Started Sat No")
    return found + [judge_files(lab)]


def test_damaged_files_are_seen(in_a_world):
    assert in_a_world(_damaged) == [[], ["left-short:.config/extra", "missing:.config/rcpinstall.properties",
                                         "short:.config/config.ini", "short:logs/shutdown.log"]]
