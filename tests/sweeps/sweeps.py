"""The sweeps: which calls there are, what is done at each of them, and what came of it.

A call of the launcher is one that comes after main has begun. main begins with giving SIGCHLD its default action, which
nothing before it does; test_harness.py holds this. Of the child that becomes the platform the exec is made to fail;
what other children do is not looked at, since strace does not follow them.
"""

import re

import outside
from lab import TRACE, Lab, hold_still
from scenarios import SCENARIOS, follow_up, judge_end, prepare, short_for_now
from world import ECLIPSE, read

MAIN_BEGINS = re.compile(r'rt_sigaction\(SIGCHLD, \{sa_handler=SIG_DFL,')

# The errors that fit a call; those that are not listed cannot fail with any of them.
PATH_ERRORS = ["ENOENT", "EACCES", "EIO", "ENOMEM"]
CHANGE_ERRORS = ["ENOSPC", "EROFS"] + PATH_ERRORS
ERRORS = {
    "read": ["EIO", "EINTR"], "pread64": ["EIO", "EINTR"],
    "write": ["ENOSPC", "EIO", "EINTR"], "pwrite64": ["ENOSPC", "EIO", "EINTR"],
    "close": ["EIO", "EINTR", "ENOSPC"],
    "fsync": ["EIO", "ENOSPC", "EINTR"],
    "lseek": ["EIO"], "_llseek": ["EIO"],
    "flock": ["EINTR", "EIO", "ENOMEM"],
    "getdents64": ["EIO", "ENOENT", "ENOMEM"],
    "wait4": ["EINTR"], "waitpid": ["EINTR"],
    "clock_nanosleep": ["EINTR"], "clock_nanosleep_time64": ["EINTR"],
    "getrandom": ["EINTR"],
    "getcwd": ["ENOENT", "EACCES", "ENOMEM"],
    "pipe2": ["EMFILE", "ENOMEM"],
    "dup": ["EMFILE"], "dup2": ["EMFILE"], "dup3": ["EMFILE"],
    "mmap": ["ENOMEM", "EACCES"], "mmap2": ["ENOMEM", "EACCES"],
    "mprotect": ["ENOMEM", "EACCES"], "munmap": ["ENOMEM"], "mremap": ["ENOMEM"], "brk": ["ENOMEM"],
    "clone": ["ENOMEM", "EAGAIN"], "clone3": ["ENOMEM", "EAGAIN"], "fork": ["ENOMEM", "EAGAIN"],
    "vfork": ["ENOMEM", "EAGAIN"],
    "access": PATH_ERRORS, "faccessat": PATH_ERRORS, "readlink": PATH_ERRORS, "readlinkat": PATH_ERRORS,
    "stat": PATH_ERRORS, "lstat": PATH_ERRORS, "fstat": ["EIO", "ENOMEM"], "newfstatat": PATH_ERRORS,
    "stat64": PATH_ERRORS, "lstat64": PATH_ERRORS, "fstat64": ["EIO", "ENOMEM"], "fstatat64": PATH_ERRORS,
    "statx": PATH_ERRORS,
    "mkdir": CHANGE_ERRORS, "rmdir": ["EROFS"] + PATH_ERRORS, "unlink": ["EROFS"] + PATH_ERRORS,
    "rename": CHANGE_ERRORS, "symlink": CHANGE_ERRORS, "chmod": ["EROFS"] + PATH_ERRORS,
    "fchmod": ["EROFS", "EIO"], "fchmodat": ["EROFS"] + PATH_ERRORS, "ftruncate": ["EIO", "EINTR"],
}
OPEN_ERRORS = ["EMFILE", "EINTR"] + PATH_ERRORS
CREATE_ERRORS = ["ENOSPC", "EROFS"] + OPEN_ERRORS


# A restart's wait for the old platform, which is gone already, takes no time.
SLEEPS = "clock_nanosleep,clock_nanosleep_time64"
NO_SLEEP = ["-e", "inject=%s:retval=0" % SLEEPS]
OF_MEMORY = ("mmap", "mmap2", "munmap", "mremap", "mprotect", "madvise", "brk")


class Call:
    """The n-th call of this name in the life of the process, the loader's included."""

    of_child = False

    def __init__(self, name, number, shown):
        self.name, self.number, self.shown = name, number, shown

    def errors(self):
        if self.name in ("open", "openat"):
            return CREATE_ERRORS if re.search(r"O_WRONLY|O_RDWR|O_CREAT", self.shown) else OPEN_ERRORS
        # The system closes a pipe whatever happens; strace, which has the call fail, leaves it open.
        if self.name == "close" and self.path().startswith("pipe:"):
            return []
        return ERRORS.get(self.name, [])

    def path(self):
        """The first path that it is about, of a descriptor too."""
        quoted = re.match(r'\w+\((?:AT_FDCWD(?:<[^>]*>)?, )?"([^"]*)"', self.shown)
        described = re.match(r"\w+\(\d+<([^>]*)>", self.shown)
        found = quoted or described
        return found.group(1) if found else ""

    def injection(self, what, lasting=False):
        """`lasting`: from this occurrence on it happens to all of them."""
        if what == "ENOMEM" and self.name == "brk":
            # The kernel answers a break that cannot be had with the one that is.
            what = "retval=" + self.before
        elif what == "KILL":
            what = "signal=KILL"
        else:
            what = "error=" + what
        # Of two injections for a call the later one counts.
        return ["-e", "trace=%s,%s" % (self.name, SLEEPS), "-e", "signal=none", *NO_SLEEP,
                "-e", "inject=%s:%s:when=%d%s" % (self.name, what, self.number, "+" if lasting else "")]


class ChildsExec(Call):
    """The exec with which a child of the launcher would become the platform. It fails in each child that tries."""

    of_child = True

    def __init__(self):
        super().__init__("execve", 0, 'execve("%s")' % ECLIPSE)

    def errors(self):
        return ["EACCES", "EIO", "EMFILE", "ENOENT", "ENOEXEC", "ENOMEM", "E2BIG", "ETXTBSY"]

    def injection(self, what, lasting=False):
        return ["-f", "-P", ECLIPSE, "-e", "trace=execve", "-e", "signal=none", "-e", "inject=execve:error=" + what]


def launcher_calls(text):
    """The calls of a trace from the beginning of main on, in order."""
    counts, calls, begun, last_break = {}, [], False, "0"
    for line in text.splitlines():
        found = re.match(r"(\w+)\(", line)
        if not found:
            continue
        name = found.group(1)
        counts[name] = counts.get(name, 0) + 1
        begun = begun or bool(MAIN_BEGINS.match(line))
        if begun:
            call = Call(name, counts[name], line)
            call.before = last_break
            calls.append(call)
        if name == "brk":
            last_break = line.rpartition("= ")[2].strip()
    assert begun, "main was not seen to begin"
    return calls


def failures(calls):
    """Each call with each error that fits it."""
    return [(call, error) for call in calls for error in call.errors()]


# A kiosk asks for the end of the session until it gets an answer: a failure that stays keeps it at that.
LASTING = [name for name in SCENARIOS if name != "kiosk"]


def lasting_failures(calls):
    """The same of errors that stay. Of a child's exec they always do; no system interrupts for ever; and what strace
    does not let a process close stays open, which no system does either."""
    return [(call, error) for call, error in failures(calls)
            if error != "EINTR" and call.name != "close" and not call.of_child]


def enter(pieces):
    hold_still()
    return Lab(pieces)


def list_calls(pieces, name):
    """In a world: the calls of an undisturbed start."""
    lab, scenario = enter(pieces), SCENARIOS[name]
    prepare(lab, scenario)
    return list_calls_of(lab, scenario)


def list_calls_of(lab, scenario):
    scenario.spoil(lab)
    status, said = lab.run(*scenario.words, strace=[*NO_SLEEP, "-e", "signal=none"])
    scenario.mend(lab)
    assert (status, said) == (0, "")
    calls = launcher_calls(read(TRACE))
    if lab.sanitized:
        # The sanitizer asks for memory of its own, and ends when there is none.
        calls = [call for call in calls if call.name not in OF_MEMORY]
    return calls + [ChildsExec()] if scenario.starts_once else calls


def disturbed(lab, scenario, call, what, lasting):
    """One disturbed start in a fresh user area: its case, with what is wrong."""
    lab.reset()
    scenario.spoil(lab)
    before = outside.around()
    status, said = lab.run(*scenario.words, strace=call.injection(what, lasting))
    disturbed_calls = [line for line in read(TRACE).splitlines() if "(INJECTED" in line and call.name + "(" in line]
    case = {"scenario": scenario.name, "call": call.name, "number": call.number, "what": what, "path": call.path(),
            "status": status, "row": "", "lines": lab.error_lines(), "problems": []}
    if what == "KILL":
        if status != -9:
            case["problems"] = ["not-reached"]
            return case
        case["problems"] = short_for_now(lab)
    else:
        if not disturbed_calls:
            case["problems"] = ["not-reached"]
            return case
        case["problems"], case["row"] = judge_end(lab, scenario, status, said)
    case["problems"] = case["problems"] + outside.changes(before)
    lab.platforms()  # what a killed launcher leaves behind has come as far as it can before anything is mended
    scenario.mend(lab)
    case["problems"] = case["problems"] + follow_up(lab, scenario)
    return case


def disturb(pieces, name, jobs, lasting=False):
    """In a world: the cases of (call, what)."""
    lab, scenario = enter(pieces), SCENARIOS[name]
    prepare(lab, scenario)
    cases = []
    for call, what in jobs:
        try:
            cases.append(disturbed(lab, scenario, call, what, lasting))
        except Exception as trouble:  # what cannot be judged is a failure of that case, not of all
            lab.end_strangers()
            cases.append({"scenario": name, "call": call.name, "number": call.number, "what": what,
                          "path": call.path(), "status": None, "row": "", "lines": [],
                          "problems": ["unjudged:%s" % trouble]})
    return cases
