"""A world: an installation of velmora in which a test starts the real executable and looks at what it left.

The paths are literal and the same in every test, since /mnt, /tmp and /dev/shm belong to the test alone. The user is
anna, number 1000. The platform and the JVM are stand-ins that record what they were given and follow a plan.
"""

import contextlib
import datetime
import os
import pathlib
import re
import signal
import stat
import subprocess
import time

import namespaces

APP = "/mnt/app"  # what ${rcp.home} stands for
PROPERTIES = APP + "/rcp/velmora.properties"
LAUNCHER = APP + "/rcp/velmora"
BASE = APP + "/base"
ECLIPSE = BASE + "/linux/x86/eclipse"
JAVA = "/mnt/jvm/bin/java"
HOME = "/mnt/home"
WORKSPACE = HOME + "/VANTOR/RCP/abc/anna"
CONFIG = WORKSPACE + "/.config"
USER_PROPERTIES = CONFIG + "/rcpinstall.properties"
LOCK = WORKSPACE + "/.rcp.lock"
MAIN = WORKSPACE + "/.rcp.main"
LOG = WORKSPACE + "/logs/velmora.log"
TEMP_LOG = "/tmp/velmora.log"

# Pieces of the commands that are built.
HEAD = [ECLIPSE, "--launcher.suppressErrors"]
STARTUP = ["-startup", BASE + "/launcher.jar", "-vmargs"]
INSTALL_AREA = ["-Drcp.osgi.install.area=/mnt/app/rcp/eclipse"]

RECORDS = "/dev/shm/stand-in"
# Options for sanitizers and coverage reach the launcher, and are taken out of what a platform was given.
FOR_THE_BUILD = ("ASAN_OPTIONS", "LSAN_OPTIONS", "UBSAN_OPTIONS", "GCOV_PREFIX", "GCOV_PREFIX_STRIP")


def read(path):
    """The whole file; bytes that are no UTF-8 become surrogates."""
    return read_bytes(path).decode("utf-8", "surrogateescape")


def read_bytes(path):
    return pathlib.Path(path).read_bytes()


def lines(*texts):
    """The texts, each with a line end."""
    return "".join(text + "\n" for text in texts)


def areas(workspace=WORKSPACE):
    """The words that name the user's area to the platform."""
    return ["-data", workspace, "-configuration", workspace + "/.config"]


def system(workspace=WORKSPACE, configuration="user"):
    """The system properties in front of those of the installation."""
    return ["-Drcp.home=/mnt/app", "-Drcp.data=" + workspace, "-Dcom.vantor.rcp.install.id=abc",
            "-Drcp.install.config=" + configuration]


def untimed(text):
    """The text with <time> for every time stamp of the log."""
    return re.sub(r"\b\d{8}_\d{6}_\d{3}\b", "<time>", text)


def system_time():
    """The time in the system's own zone, whatever that of the test is: no TZ is handed to a start."""
    zone = subprocess.run(["/usr/bin/env", "-u", "TZ", "/usr/bin/date", "+%z"], stdout=subprocess.PIPE, text=True,
                          check=True).stdout
    return datetime.datetime.now(datetime.datetime.strptime(zone, "%z\n").tzinfo).replace(tzinfo=None)


def until(condition, what, within=20):
    """Asks again and again until the condition gives something true, and returns that."""
    deadline = time.monotonic() + within
    while True:
        answer = condition()
        if answer:
            return answer
        assert time.monotonic() < deadline, "not within %s seconds: %s" % (within, what)
        time.sleep(0.005)


class Platform:
    """One recorded start of a stand-in."""

    def __init__(self, record):
        words = record.split(b"\0")
        assert words.pop() == b"", "a cut record"
        take = lambda: words.pop(0)
        text = lambda: take().decode("utf-8", "surrogateescape")
        self.pid = int(take())
        self.status = dict(line.split(":\t", 1) for line in text().splitlines() if ":\t" in line)
        self.exe = text()
        self.program = text()  # the path as it was given to exec
        self.cwd = text()
        self.umask = int(take(), 8)
        self.raw_argv = [take() for _ in range(int(take()))]
        self.argv = [word.decode("utf-8", "surrogateescape") for word in self.raw_argv]
        pairs = [text().split("=", 1) for _ in range(int(take()))]
        self.env = {name: value for name, value in pairs if name not in FOR_THE_BUILD}
        self.descriptors = dict(text().split(" ", 1) for _ in range(int(take())))
        self.descriptors = {int(number): target for number, target in self.descriptors.items()}

    def alive(self):
        return state(self.pid) not in (None, "Z", "X")

    def end(self):
        """Lets it go on with its plan after "sleep" or "wait", and waits until it is gone."""
        os.kill(self.pid, signal.SIGTERM)
        until(lambda: state(self.pid) in (None, "Z"), "the platform has ended")


class Start:
    """One start of the launcher."""

    def __init__(self, process, out, err):
        self.pid = process.pid
        self.status = None
        self.seconds = None
        self._process, self._out, self._err = process, out, err
        self._began = time.monotonic()

    def age(self):
        """Seconds since it was started."""
        return time.monotonic() - self._began

    def running(self):
        return self._process.poll() is None

    def wait(self, within=30):
        """Waits for the launcher alone, not for what it started. Never does it say anything."""
        try:
            self.status = self._process.wait(within)
        except subprocess.TimeoutExpired:
            raise AssertionError("the launcher is still running after %s seconds" % within) from None
        self.seconds = self.age()
        said = tuple(os.pread(fd, 1 << 20, 0).decode("utf-8", "replace") for fd in (self._out, self._err))
        assert said == ("", ""), "standard output and standard error: %r, %s" % said
        return self


class World:
    def __init__(self, launcher, stand_in, uid=1000):
        self.uid = uid
        self.sanitized = b"__asan_init" in launcher
        self._launcher, self._stand_in = launcher, stand_in
        self._starts, self._holders = [], []

    def enter(self):
        """The first thing that happens in the namespaces."""
        pathlib.Path(RECORDS).mkdir()
        os.chmod(RECORDS, 0o777)
        os.mkdir(HOME)

    # ---- what is there before a start

    def write(self, path, text="", mode=None):
        """A file of anna's, with the folders that it needs; text, or bytes."""
        os.makedirs(os.path.dirname(path), exist_ok=True)
        with open(path, "wb") as file:
            file.write(text if isinstance(text, bytes) else text.encode("utf-8", "surrogateescape"))
        if mode is not None:
            os.chmod(path, mode)
        return path

    def folder(self, path, mode=None):
        os.makedirs(path, exist_ok=True)
        if mode is not None:
            os.chmod(path, mode)
        return path

    def link(self, path, target):
        os.makedirs(os.path.dirname(path), exist_ok=True)
        os.symlink(target, path)
        return path

    def stand_in(self, path):
        return self.write(path, self._stand_in, 0o755)

    def launcher(self, path):
        return self.write(path, self._launcher, 0o755)

    def install(self, configuration="user", *more):
        """A whole installation. `more` are further lines of velmora.properties; the configuration may be None."""
        self.launcher(LAUNCHER)
        known = ["rcp.install.id=abc", "rcp.base.location=${rcp.home}/base"]
        if configuration is not None:
            known.append("install.configuration=" + configuration)
        self.properties(*known, *more)
        self.base_properties()
        self.write(BASE + "/config.ini", "osgi.bundles=a, b\n")
        self.write(BASE + "/platform.xml", "<config>\n</config>\n")
        self.stand_in(ECLIPSE)
        return self

    def properties(self, *texts):
        """velmora.properties, whole."""
        self.write(PROPERTIES, lines(*texts))

    def base_properties(self, *texts):
        """The installation's rcpinstall.properties, from which the user's copy is made."""
        self.write(BASE + "/rcpinstall.properties", lines(*texts))

    def jvm_properties(self, *texts, root=APP + "/rcp/deploy/"):
        self.write(root + "jvm.properties", lines(*texts))

    def plan(self, *words, start=None):
        """What stand-ins do: the words of stand_in.c's plan; for the start of that number, or for every other one."""
        name = "/plan" if start is None else "/plan.%d" % start
        self.write(RECORDS + name, "".join(str(word) + "\0" for word in words))

    def holder(self, program, *words):
        """A live process of that program, such as another platform; a stand-in neither records nor ends."""
        process = subprocess.Popen([program, *words], env={"STAND_IN_HOLDS": "1"}, stdin=subprocess.DEVNULL)
        self._holders.append(process)
        until(lambda: executable(process.pid) != executable(os.getpid()), "the holder runs its program")
        return process

    def end(self, holder):
        """Ends a holder, and buries it."""
        holder.kill()
        holder.wait()
        self._holders.remove(holder)

    @contextlib.contextmanager
    def privileged(self):
        """The privileges of the world: to mount, to give files away."""
        if not namespaces.is_root():
            yield
            return
        user = os.geteuid()
        os.seteuid(0)
        try:
            yield
        finally:
            os.seteuid(user)

    def small_disk(self, path, size):
        """A file system of its own at the folder, which is full after so many bytes (whole pages)."""
        self.folder(path)
        with self.privileged():
            namespaces.mount("tmpfs", path, "mode=0755,uid=%d,gid=%d,size=%d" % (self.uid, self.uid, size))
        return path

    def give(self, path, uid):
        """The file now belongs to that user; needs root."""
        with self.privileged():
            os.chown(path, uid, uid, follow_symlinks=False)

    # ---- starting

    def environment(self, env=None):
        """What a start is given: the usual variables, with those of `env` replaced, or removed where None."""
        known = {"HOME": HOME, "USER": "anna", "LC_ALL": "C.UTF-8", "PATH": "/usr/bin:/bin", **(env or {})}
        return {name: value for name, value in known.items() if value is not None}

    def start(self, *words, program=LAUNCHER, argv0=None, env=None, uid=None, cwd="/mnt", umask=0o022, closed=(),
              ignored=(), strace=None):
        """Starts the launcher and returns at once. `closed` are descriptors that are closed, `ignored` signals that are
        ignored; `strace` are words for strace, such as "-e", "inject=clone:error=EAGAIN"; the tracer goes away by
        itself."""
        given = self.environment(env)
        for name in FOR_THE_BUILD:
            if name in os.environ:
                given[name] = os.environ[name]
        if os.path.isdir("/dev/shm/outer"):
            given["GCOV_PREFIX"] = "/dev/shm/outer"
        command = [argv0 or program, *words]
        if strace is not None:
            assert argv0 is None
            # The leak check traces its own process, which a traced process cannot.
            given["ASAN_OPTIONS"] = ":".join(filter(None, [given.get("ASAN_OPTIONS"), "detect_leaks=0"]))
            program, command = "/usr/bin/strace", ["strace", "-D", "-f", "-o", "/dev/shm/strace", *strace, *command]

        def just_before():
            for number in closed:
                os.close(number)
            for number in ignored:
                signal.signal(number, signal.SIG_IGN)

        out, err = (os.memfd_create(name) for name in ("out", "err"))
        uid = self.uid if uid is None else uid
        with self.privileged() if uid != self.uid else contextlib.nullcontext():
            process = subprocess.Popen(
                command, executable=program, env=given, cwd=cwd, umask=umask, stdin=subprocess.DEVNULL, stdout=out,
                stderr=err, user=uid, group=uid, extra_groups=[] if uid != self.uid else None,
                preexec_fn=just_before)
        start = Start(process, out, err)
        self._starts.append(start)
        return start

    def run(self, *words, within=30, **how):
        """Starts the launcher and waits until it has ended."""
        return self.start(*words, **how).wait(within)

    # ---- what came of it

    def platforms(self):
        """Every recorded start, in order. Waits until each process in the world has either recorded itself or ended."""
        until(self._settled, "every started process has recorded itself: %s" % self.strangers)
        trouble = pathlib.Path(RECORDS, "trouble")
        assert not trouble.exists(), "the stand-in: " + trouble.read_text()
        return self._records()

    def platform(self, number=0, within=20):
        """The start of that number, as soon as it is recorded."""
        record = pathlib.Path(RECORDS, str(number), "record")
        until(record.exists, "platform number %d has started" % number, within)
        return Platform(record.read_bytes())

    def all_ended(self):
        """Waits until everything that was started is gone, so that the next start finds no living platform."""
        until(lambda: not self.strangers(), "every started process has ended")

    def only_platform(self):
        platforms = self.platforms()
        assert len(platforms) == 1, [platform.argv for platform in platforms]
        return platforms[0]

    def _records(self):
        found = sorted(int(path.parent.name) for path in pathlib.Path(RECORDS).glob("*/record"))
        return [self.platform(number) for number in found]

    def strangers(self):
        """Processes that neither the test nor the harness started directly."""
        known = [1, os.getpid()] + [holder.pid for holder in self._holders]
        known += [start.pid for start in self._starts if start.running()]
        return [pid for pid in map(int, filter(str.isdigit, os.listdir("/proc"))) if pid not in known]

    def _settled(self):
        recorded = {platform.pid for platform in self._records()}
        return not [pid for pid in self.strangers() if pid not in recorded
                    and state(pid) not in (None, "Z", "X") and not executable(pid).endswith("/strace")]

    def fatal(self, start, message, reason=None):
        """The start ended with status 255 and nothing was started; the last line of its log is the message and, after
        it, the system's reason: the given one, or any where no call of the system has failed. The log is the one in the
        user's area when there is one, else the one in /tmp."""
        assert (start.status, self.platforms()) == (255, [])
        found = user_logs() or temp_logs()
        assert len(found) == 1, found
        line, last = read(found[0]), "\n" if found == user_logs() else "\n\n"
        assert line.endswith(last)
        line = line[:-len(last)].rpartition("\n")[2]
        if reason is None:
            assert line.startswith(message + " : ")
            assert line[len(message) + 3:] in map(os.strerror, range(134))
        else:
            assert line == message + " : " + reason

    def temp_log(self):
        """The only log in /tmp, whatever its name."""
        found = temp_logs()
        assert len(found) == 1, found
        return read(found[0])

    def log(self):
        """The plain log in the user's area, without its times."""
        return untimed(read(LOG))


def temp_logs():
    """The logs in /tmp; held lines that are saved there are followed by an empty line."""
    return sorted(map(str, pathlib.Path("/tmp").glob("velmora*.log")))


def user_logs():
    """The logs in all user areas."""
    return sorted(os.path.join(folder, name) for folder, _, names in os.walk("/mnt") for name in names
                  if os.path.basename(folder) == "logs" and re.fullmatch(r"velmora.*\.log", name))


def tree(top):
    """What lies below the folder: one sorted line for each, "0755 folder/", "0644 file" or "link -> target"."""
    found = []
    for folder, folders, files in os.walk(top):
        for name in folders + files:
            path = os.path.join(folder, name)
            shown, mode = os.path.relpath(path, top), os.lstat(path).st_mode
            if stat.S_ISLNK(mode):
                found.append((shown, "%s -> %s" % (shown, os.readlink(path))))
            else:
                found.append((shown, "%04o %s" % (stat.S_IMODE(mode), shown + "/" * stat.S_ISDIR(mode))))
    return [line for _, line in sorted(found)]


def state(pid):
    """The letter of the process's state, or None when there is no such process."""
    try:
        with open("/proc/%d/stat" % pid) as file:
            return file.read().rsplit(")", 1)[1].split()[0]
    except OSError:
        return None


def executable(pid):
    """The program that the process runs."""
    try:
        return os.readlink("/proc/%d/exe" % pid)
    except OSError:
        return ""
