"""One world in which the launcher is started thousands of times, each time in a user area as if it were new.

Runs inside namespaces.isolated: /mnt, /tmp and /dev/shm are private, and every process that is seen in /proc belongs
to the sweep. A scenario is prepared once; before each start its user area is put back as it was.
"""

import ctypes
import os
import re
import select
import shutil
import signal
import time

import namespaces
from pieces import sanitized
from world import (APP, BASE, CONFIG, ECLIPSE, HOME, JAVA, LAUNCHER, LOCK, PROPERTIES, RECORDS, USER_PROPERTIES,
                   WORKSPACE, Platform, executable, lines, read, read_bytes, state, temp_logs, tree, until, user_logs)

UPDATE = CONFIG + "/org.eclipse.update"
EXIT_DATA = HOME + "/.exitData"
SAVED = "/mnt/saved"  # the user area and the installation as they are before the start
TRACE = "/dev/shm/trace"
PRELOADED = APP + "/pre load/libx.so"  # with a blank, so that it needs a link
LONGEST = 15  # seconds that a start may take; the fixed waits of these scenarios are of one second

ADDR_NO_RANDOMIZE = 0x0040000


def hold_still():
    """Leaves all privileges, and has addresses of started programs always the same."""
    libc = ctypes.CDLL(None, use_errno=True)
    uid, gid = os.geteuid(), os.getegid()
    if os.getresuid() != (uid, uid, uid):
        os.setresgid(gid, gid, gid)
        os.setresuid(uid, uid, uid)
        libc.prctl(namespaces.PR_SET_DUMPABLE, 1)
    if libc.personality(ADDR_NO_RANDOMIZE) < 0:
        raise OSError(ctypes.get_errno(), "personality")


def write(path, text="", mode=None):
    os.makedirs(os.path.dirname(path), exist_ok=True)
    with open(path, "wb") as file:
        file.write(text if isinstance(text, bytes) else text.encode())
    if mode is not None:
        os.chmod(path, mode)


def remove(path):
    if os.path.isdir(path) and not os.path.islink(path):
        shutil.rmtree(path)
    elif os.path.lexists(path):
        os.unlink(path)


class Process:
    """A launcher that was started, perhaps under strace. Says nothing on its own."""

    def __init__(self, command, env, cwd="/mnt"):
        self.out, self.err = os.memfd_create("out"), os.memfd_create("err")
        here = os.open(".", os.O_RDONLY)
        os.chdir(cwd)
        try:
            self.pid = os.posix_spawn(command[0], command, env, file_actions=[
                (os.POSIX_SPAWN_OPEN, 0, "/dev/null", os.O_RDONLY, 0),
                (os.POSIX_SPAWN_DUP2, self.out, 1), (os.POSIX_SPAWN_DUP2, self.err, 2)])
        finally:
            os.fchdir(here)
            os.close(here)
        self._watch = os.pidfd_open(self.pid)
        self.status = None

    def ended(self, within=0.0):
        """Whether it has ended, after waiting so long at most. A signal gives a negative status."""
        if self.status is None and select.select([self._watch], [], [], within)[0]:
            self.status = os.waitstatus_to_exitcode(os.waitpid(self.pid, 0)[1])
            os.close(self._watch)
        return self.status is not None

    def kill(self):
        if not self.ended():
            os.kill(self.pid, signal.SIGKILL)
            self.ended(60)

    def said(self):
        """What it wrote to its standard output and error; call it once, at the end."""
        texts = [os.pread(fd, 4096, 0).decode("utf-8", "replace") for fd in (self.out, self.err)]
        os.close(self.out)
        os.close(self.err)
        # strace has a word to say of a break that would not fit into 32 bits.
        return re.sub(r"\S*strace: Injected return value .* will be clipped to .* in compat personality\n", "",
                      "".join(texts))


class Lab:
    def __init__(self, pieces):
        """`pieces`: the bytes of the launcher, the stand-in and the session library."""
        self.pieces = pieces
        self.holder = None
        self.env = {"HOME": HOME, "USER": "anna", "LC_ALL": "C.UTF-8", "PATH": "/mnt/bin:/usr/bin:/bin"}
        self.sanitized = sanitized(pieces)
        if self.sanitized:
            # The leak check would trace its own process, which is traced already.
            self.env["ASAN_OPTIONS"] = os.environ.get("ASAN_OPTIONS", "") + ":detect_leaks=0"
            self.env["UBSAN_OPTIONS"] = os.environ.get("UBSAN_OPTIONS", "")
        os.mkdir(RECORDS)
        write("/mnt/bin/killall", "#!/bin/sh\n", 0o755)
        write("/mnt/lockdown.so", pieces["lockdown"], 0o755)
        os.mkdir(SAVED)

    # ---- what is there before a start

    def install(self, configuration="user", *more, preload=True):
        """An installation with something of everything that a start touches."""
        remove(APP)
        write(LAUNCHER, self.pieces["launcher"], 0o755)
        write(PROPERTIES, lines("rcp.install.id=abc", "rcp.base.location=${rcp.home}/base",
                                "install.configuration=" + configuration, "jvm.location=" + JAVA,
                                "jvm.feature.id=f", "jvm.feature.version=1", *more))
        write(BASE + "/config.ini", lines("osgi.bundles=a,b,c,d,e", "eclipse.product=x"))
        write(BASE + "/rcpinstall.properties",
              lines("# the installation", "application=app.one", "resetDir.1=state.one", "-Dx=1", "vmarg.Xmx=-Xmx1g",
                    *(["library.preload=" + PRELOADED] if preload else [])))
        write(BASE + "/platform.xml", lines("<config>", "<site>", "</site>", "</config>"))
        write(APP + "/rcp/deploy/jvm.properties", lines("vmarg.Xms=-Xms64m", "jvm.library.path=lib"))
        write(APP + "/shared/eclipse/.eclipseextension", lines("name=shared", "version=1"))
        write(PRELOADED)
        write(ECLIPSE, self.pieces["stand_in"], 0o755)

    def keep(self):
        """The user area and the installation as they are now: what `reset` goes back to."""
        remove(SAVED)
        os.mkdir(SAVED)
        if os.path.isdir(HOME):
            shutil.copytree(HOME, SAVED + "/home", symlinks=True)
        self.saved_properties = read_bytes(PROPERTIES)

    def reset(self):
        self.end_strangers()
        self.wait_for_end()
        remove(HOME)
        if os.path.isdir(SAVED + "/home"):
            shutil.copytree(SAVED + "/home", HOME, symlinks=True)
        else:
            os.mkdir(HOME)
        for name in os.listdir("/tmp"):
            remove("/tmp/" + name)
        self.forget_platforms()
        if read_bytes(PROPERTIES) != self.saved_properties:
            write(PROPERTIES, self.saved_properties)

    def forget_platforms(self):
        for name in os.listdir(RECORDS):
            if not name.startswith("plan"):
                remove(RECORDS + "/" + name)

    def plan(self, *words, start=None):
        """What stand-ins do, as world.World.plan."""
        name = "/plan" if start is None else "/plan.%d" % start
        write(RECORDS + name, "".join(str(word) + "\0" for word in words))

    def no_plans(self):
        for name in os.listdir(RECORDS):
            if name.startswith("plan"):
                remove(RECORDS + "/" + name)

    def hold(self):
        """A platform that lives as long as the world does."""
        self.holder = os.posix_spawn(ECLIPSE, [ECLIPSE], {"STAND_IN_HOLDS": "1"})
        while executable(self.holder) != ECLIPSE:
            time.sleep(0.001)

    # ---- starting

    def start(self, *words, strace=None, env=None):
        command = [LAUNCHER, *words]
        given = {**self.env, **(env or {})}
        if strace is not None:
            command = ["/usr/bin/strace", "-qq", "-y", "-s", "32", "-o", TRACE, *strace, *command]
        return Process(command, given)

    def run(self, *words, within=LONGEST, **how):
        """(status, or "hang" when it did not end in time; what it said)."""
        process = self.start(*words, **how)
        if not process.ended(within):
            self.end_strangers()
            process.kill()
            process.said()
            return "hang", ""
        return process.status, process.said()

    # ---- what came of it

    def strangers(self):
        known = (1, os.getpid(), self.holder)
        return [pid for pid in map(int, filter(str.isdigit, os.listdir("/proc"))) if pid not in known]

    def living(self):
        return [pid for pid in self.strangers() if state(pid) not in (None, "Z", "X")]

    def platforms(self):
        """Every recorded platform, once every process has recorded itself or ended."""
        deadline = time.monotonic() + LONGEST
        while True:
            found = self.records()
            known = {platform.pid for platform in found}
            if all(pid in known for pid in self.living()):
                break
            if time.monotonic() > deadline:
                raise RuntimeError("a process neither records itself nor ends: %s" % self.living())
            time.sleep(0.0005)
        found = self.records()
        if os.path.exists(RECORDS + "/trouble"):
            raise RuntimeError("the stand-in: " + read(RECORDS + "/trouble"))
        return found

    def records(self):
        numbers = sorted(int(name) for name in os.listdir(RECORDS) if name.isdigit())
        paths = ["%s/%d/record" % (RECORDS, number) for number in numbers]
        return [Platform(read_bytes(path)) for path in paths if os.path.exists(path)]

    def end_platforms(self):
        """Every living platform goes on with its plan, and ends."""
        for pid in self.living():
            try:
                os.kill(pid, signal.SIGTERM)
            except ProcessLookupError:
                pass
        self.wait_for_end()

    def wait_for_end(self, within=LONGEST):
        deadline = time.monotonic() + within
        while self.strangers():  # one that is dead but not buried still counts as running for the launcher
            if time.monotonic() > deadline:
                raise RuntimeError("still there: %s" % [(pid, executable(pid)) for pid in self.strangers()])
            time.sleep(0.0005)

    def end_strangers(self):
        while True:
            living = self.living()
            if not living:
                return
            for pid in living:
                try:
                    os.kill(pid, signal.SIGKILL)
                except ProcessLookupError:
                    pass
            time.sleep(0.001)

    def waits_for_lock(self, process):
        """Whether the launcher stands in flock, since somebody else has the lock."""
        try:
            with open("/proc/%d/syscall" % process.pid) as file:
                return file.read().split(" ")[0] in ("73", "143")  # in 64 and in 32 bits
        except OSError:  # gone, or just becoming the launcher
            return False

    def end_behind(self, process):
        """Ends the platforms while a launcher waits for the lock. It stands still until they are gone: a platform that
        is just ending lets go of the lock before its number is free, and would still count as running."""
        os.kill(process.pid, signal.SIGSTOP)
        for platform in self.records():
            if platform.alive():
                os.kill(platform.pid, signal.SIGTERM)
        numbers = [platform.pid for platform in self.records()]
        until(lambda: not any(state(number) for number in numbers), "the platforms are gone")
        os.kill(process.pid, signal.SIGCONT)

    # ---- the files

    def snapshot(self):
        """The user area, what differs from run to run made alike; without the logs, which are judged apart."""
        found = {}
        for line in tree(HOME):
            mode, _, name = line.partition(" ")
            if " -> " in line and not mode.isdigit():
                found[line] = ""
                continue
            path = HOME + "/" + name
            if "/logs/" in path and not name.endswith("/") or name == ".exitData":
                continue
            text = "" if name.endswith("/") else read(path)
            if path in (LOCK, WORKSPACE + "/.rcp.main"):
                text = re.sub(r"^\d+ +$", "<pid>", text)
            if path == USER_PROPERTIES:
                text = text.replace("provisioning.manifest.version=7\n", "")
            found[os.path.relpath(path, WORKSPACE)] = mode + " " + text
        return found

    def history(self):
        """The lines of the history of starts that are not what a whole start writes."""
        path = WORKSPACE + "/logs/shutdown.log"
        if not os.path.exists(path):
            return []
        whole = r"Started [A-Z][a-z]{2} [A-Z][a-z]{2} [ 0-9]\d \d\d:\d\d:\d\d \d{4}\n"
        return [line for line in read(path).splitlines(True) if not re.fullmatch(whole, line)]

    def last_lines(self):
        """The last line of each log."""
        texts = [read(path).rstrip("\n") for path in user_logs() + temp_logs()]
        return [text.rpartition("\n")[2] for text in texts]

    def error_lines(self):
        """The numbers of all error lines in the logs."""
        texts = [read(path) for path in user_logs() + temp_logs()]
        return sorted({number for text in texts for number in re.findall(r"^QVMRL[0-9]{4}E", text, re.M)})
