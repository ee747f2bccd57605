"""The world in which starts are measured: private and in memory, each kind of start with a user area of its own.

Runs inside namespaces.isolated. Every start is looked at afterwards: one that did not do what it is there for is no
measurement, and ends all of it.
"""

import ctypes
import os
import pathlib
import re
import shutil
import time

import namespaces

PARTS = "/mnt/parts"
STAMP = "/dev/shm/stamp"
STAY = "/dev/shm/stay"
BASE = "/rcp/eclipse/plugins/base"
ECLIPSE = BASE + "/linux/x86/eclipse"
DISK = "/dev/shm/outer"  # what namespaces.isolated binds there
FULL_HISTORY = 200  # lines that the history of starts has at most
SCENARIOS = {"first": "a first start", "warm": "a warm start", "daily": "a warm start, the history of starts full",
             "beside": "a start beside a running platform", "fatal": "a start that ends in a fatal error"}


class Failed(Exception):
    """A start did not do what was to be measured."""


def go_first():
    """Whether what is measured now comes before all else that the machine does, which root may have: otherwise
    whatever else it does stretches the starts that take many processes most. What is compared goes first alike."""
    if not namespaces.is_root():
        return False
    user = os.geteuid()
    os.seteuid(0)
    try:
        os.sched_setscheduler(0, os.SCHED_FIFO, os.sched_param(1))
    except PermissionError:
        return False
    finally:
        os.seteuid(user)
    return True


def leave_privileges():
    uid, gid = os.geteuid(), os.getegid()
    if os.getresuid() != (uid, uid, uid):
        os.setresgid(gid, gid, gid)
        os.setresuid(uid, uid, uid)
        ctypes.CDLL(None).prctl(namespaces.PR_SET_DUMPABLE, 1)


def write(path, data, mode=0o644):
    os.makedirs(os.path.dirname(path), exist_ok=True)
    with open(path, "wb") as file:
        file.write(data)
    os.chmod(path, mode)


def remove(path):
    if os.path.isdir(path):
        shutil.rmtree(path)
    elif os.path.exists(path):
        os.unlink(path)


def arrival():
    """What was told: the stamp's eight bytes, then the words and the environment, each text with its end."""
    with open(STAMP, "rb") as file:
        return file.read()


def told():
    """The words of the platform that has arrived, and its environment."""
    words, _, environment = arrival()[8:].decode().partition("\0\0")
    return words.split("\0"), sorted(environment.split("\0")[:-1])


def spawn(command, env, *descriptors):
    """(status, what it said). It inherits the descriptors, and is waited for."""
    said = os.memfd_create("said")
    for number in descriptors:
        os.set_inheritable(number, True)
    pid = os.posix_spawn(command[0], command, env, file_actions=[
        (os.POSIX_SPAWN_OPEN, 0, "/dev/null", os.O_RDONLY, 0),
        (os.POSIX_SPAWN_DUP2, said, 1), (os.POSIX_SPAWN_DUP2, said, 2)])
    status = os.waitstatus_to_exitcode(os.waitpid(pid, 0)[1])
    text = os.pread(said, 4096, 0).decode("utf-8", "replace")
    os.close(said)
    return status, text


def watched(contestant, command):
    """What the stopwatch says of the command, after which nothing of it is left."""
    result = os.memfd_create("result")
    status, said = spawn([PARTS + "/stopwatch", str(result), command[0], *command], contestant.env, result)
    told = os.pread(result, 4096, 0).split()
    os.close(result)
    if (status, said, len(told)) != (0, "", 8):
        raise Failed("%s: %d %s" % (contestant.name, status, said))
    return list(map(int, told))


class Contestant:
    """One kind of start: its command, and what must have come of it."""
    status = 0
    arrives = True  # something tells its arrival
    left = 1  # processes that live on when the one that was started has ended

    def __init__(self, name, title, command, **env):
        self.name, self.title, self.command = name, title, command
        self.home = "/mnt/home/" + name
        self.env = {"HOME": self.home, "USER": "anna", "LC_ALL": "C.UTF-8", "PATH": "/usr/bin:/bin", **env}

    def prepare(self):
        os.makedirs(self.home, exist_ok=True)

    def check(self, words):
        """The words are those that the platform was given."""
        if len(words) != 1:
            raise Failed("%s: the child was given %r" % (self.name, words))


class Script(Contestant):
    def check(self, words):
        if words[1:3] != ["-data", self.home + "/VANTOR/RCP/demo-1/anna"]:
            raise Failed("%s: the platform was given %r" % (self.name, words))


class JavaLauncher(Contestant):
    left = 0

    def check(self, words):
        pass  # it has no words to give yet


class Start(Contestant):
    """A start of velmora."""

    def __init__(self, build, scenario, home=None, name=None, **env):
        app = "/mnt/%s/app" % build
        super().__init__(name or "%s-%s" % (build, scenario), SCENARIOS[scenario], [app + "/rcp/velmora"], **env)
        self.build, self.scenario = build, scenario
        if home:
            self.home = self.env["HOME"] = home
        self.workspace = self.home + "/VANTOR/RCP/demo-1/anna"
        self.history = self.workspace + "/logs/shutdown.log"
        self.platform = None  # the number of the one that runs
        if scenario == "fatal":
            self.command, self.status, self.arrives, self.left = [*self.command, "-vm"], 255, False, 0

    def prepare(self):
        if self.scenario == "first":
            remove(self.home)
            os.makedirs(self.home)
        elif not os.path.exists(self.home):
            self._begin()
        else:
            write(self.history, self.saved)

    def _begin(self):
        """A first start, after which there is a user area; its platform stays where one is to run."""
        os.makedirs(self.home)
        stays = self.scenario == "beside"
        if stays:
            write(STAY, b"")
        remove(STAMP)
        write(STAMP, b"", 0o666)
        if spawn(self.command[:1], self.env) != (0, ""):
            raise Failed("%s: the start before it" % self.name)
        lock = pathlib.Path(self.workspace, ".rcp.lock")
        self.platform = int(lock.read_text())
        deadline = time.monotonic() + 20
        while len(arrival()) < 9 or not stays and os.path.exists("/proc/%d" % self.platform):
            if time.monotonic() > deadline:
                raise Failed("%s: no platform came of the start before it" % self.name)
            time.sleep(0.001)
        remove(STAY)
        with open(self.history, "rb") as file:
            self.saved = file.read()
        if self.scenario == "daily":
            self.saved = self.saved * FULL_HISTORY

    def check(self, words):
        log = pathlib.Path(self.workspace, "logs", "velmora.log").read_text()
        if self.scenario == "fatal":
            last = log.rstrip("\n").rpartition("\n")[2]
            if not last.startswith("QVMRL0079E: -vm on command line must be followed by a valid jvm path."):
                raise Failed("%s: the last line of its log is %r" % (self.name, last))
            return
        areas = ["-data", self.workspace, "-configuration", self.workspace + "/.config"]
        if not any(words[at:at + 4] == areas for at in range(len(words))):
            raise Failed("%s: the platform was given %r" % (self.name, words))
        if ("-useDaemon" in words) != (self.scenario == "beside"):
            raise Failed("%s: the wrong role: %r" % (self.name, words))
        if self.scenario == "beside" and str(self.platform) not in words:
            raise Failed("%s: not beside the platform %d: %r" % (self.name, self.platform, words))
        for name in ("args.properties", "rcpinstall.properties", "config.ini", "org.eclipse.update/platform.xml"):
            if os.path.getsize(self.workspace + "/.config/" + name) == 0:
                raise Failed("%s: %s is empty" % (self.name, name))


class Least(Contestant):
    """A program that only makes the calls of a start; but for first starts, in a user area of velmora's."""

    def __init__(self, build, scenario):
        self.start = Start(build, scenario, name="least-%s-%s" % (build, scenario))
        app = "/mnt/%s/app" % build
        super().__init__(self.start.name, "dynamic C program, the calls of %s" % SCENARIOS[scenario],
                         [PARTS + "/least-" + build, app, self.start.workspace, app + ECLIPSE])
        if scenario != "warm":
            self.command.append(scenario)

    def prepare(self):
        self.start.prepare()

    def check(self, words):
        super().check(words)
        if not pathlib.Path(self.start.workspace, "logs", "velmora.log").read_text().endswith("released.\n"):
            raise Failed("%s: it did not come to its end" % self.name)


class Plain(Contestant):
    """A program for just a warm start, in a user area of velmora's: it leaves there what velmora does."""
    LEFT = ("logs/velmora.log", ".config/args.properties", ".rcp.main", ".rcp.lock")

    def __init__(self, build):
        self.start = Start(build, "warm", name="plain-%s-warm" % build)
        super().__init__(self.start.name, "dynamic C program for just %s" % SCENARIOS["warm"],
                         [PARTS + "/plain-" + build, self.start.command[0]])
        self.expected = None

    def prepare(self):
        self.start.prepare()
        if self.expected is None:
            World.measure(self.start)
            self.expected = self._found()
            self.start.prepare()

    def _found(self):
        """What the platform was given, and what the files hold; but for times and the platform's number."""
        texts = [pathlib.Path(self.start.workspace, name).read_text() for name in self.LEFT]
        texts = [re.sub(r"@ \d{8}_\d{6}_\d{3}$", "@ then", text, flags=re.M) for text in texts[:2]] + [
            re.sub(r"^\d+", "N", text) for text in texts[2:]]
        return told(), texts, pathlib.Path(self.start.history).read_text().count("\n")

    def check(self, words):
        found = self._found()
        if found != self.expected:
            raise Failed("%s: %r instead of %r" % (self.name, found, self.expected))


class World:
    def __init__(self, parts):
        self.first = go_first()
        leave_privileges()
        for name, data in parts["files"].items():
            write(PARTS + "/" + name, data, 0o755)
        for name, (data, mode) in parts["java"].items():
            write("/mnt/java/" + name, data, mode)
        write("/mnt/java/lib/runtime/lib/libjli.so", parts["files"]["libjli.so"], 0o755)
        os.mkdir("/mnt/no-tools")
        for build, launcher in parts["launchers"].items():
            self.install("/mnt/%s/app" % build, launcher, parts)

    @staticmethod
    def install(app, launcher, parts):
        """The example's installation; the measured child in the places of its programs."""
        for name, (data, mode) in parts["platform"].items():
            write("%s/%s" % (app, name), data, mode)
        write(app + "/rcp/velmora", launcher, 0o755)
        write(app + "/rcp/naive.sh", parts["files"]["naive.sh"], 0o755)
        for name in (ECLIPSE, "/rcp/eclipse/plugins/velmora.demo.jvm/jre/bin/java"):
            write(app + name, parts["files"]["child"], 0o755)
        for name in ("launcher.jar", "startup.jar"):
            write("%s%s/%s" % (app, BASE, name), b"")

    @staticmethod
    def others():
        """What velmora is compared with."""
        child = "/mnt/native/app" + ECLIPSE
        return [
            Contestant("limit", "static C program: fork, exec", [PARTS + "/limit", child]),
            Contestant("floor-native", "dynamic C program, locale set", [PARTS + "/floor-native", child]),
            Contestant("floor-i686", "dynamic C program, locale set", [PARTS + "/floor-i686", child]),
            *(Least(build, scenario) for scenario in ("first", "warm", "beside") for build in ("native", "i686")),
            *(Plain(build) for build in ("native", "i686")),
            Script("dash", "dash script, four settings", ["/mnt/native/app/rcp/naive.sh"]),
            JavaLauncher("jpackage", "`jpackage` launcher, no package tool on PATH", ["/mnt/java/bin/platform"],
                         PATH="/mnt/no-tools"),
        ]

    @staticmethod
    def limit_with_ps(platform):
        """The question whether the platform runs, as velmora has to ask it."""
        command = "ps h %d | grep eclipse 2>&1 1>/dev/null" % platform
        return Contestant("limit-ps", "the limit, after the shell's `ps` and `grep`",
                          [PARTS + "/limit", "/mnt/native/app" + ECLIPSE, command])

    @staticmethod
    def measure(contestant):
        """One start: milliseconds to the child (or None) and to the end, processor time in milliseconds, KB, faults."""
        contestant.prepare()
        for name in os.listdir("/tmp"):
            remove("/tmp/" + name)
        child, end, cpu, resident, faults, ended, left, failed = watched(contestant, contestant.command)
        words = told()[0]
        if (ended, left, failed, child >= 0) != (contestant.status, contestant.left, 0, contestant.arrives):
            raise Failed("%s: status %d, %d processes left, %d failed, arrival %d" % (
                contestant.name, ended, left, failed, child))
        contestant.check(words)
        return {"to_child": child / 1e6 if child >= 0 else None, "to_exit": end / 1e6, "cpu": cpu / 1e3,
                "resident": resident, "faults": faults}
