"""The example installation of ./demo in a test's own world, and what the real platform in it printed."""

import io
import os
import pathlib
import re
import subprocess
import tarfile
import time

from world import FOR_THE_BUILD, until

APP = "/mnt/app"  # what ${rcp.home} stands for
PLUGINS = APP + "/rcp/eclipse/plugins"
BASE = PLUGINS + "/base"
JAVA = PLUGINS + "/velmora.demo.jvm/jre/bin/java"
LAUNCHER = APP + "/rcp/velmora"
HOME = "/mnt/home"
WORKSPACE = HOME + "/VANTOR/RCP/demo-1/anna"
CONFIG = WORKSPACE + "/.config"
USER_PROPERTIES = CONFIG + "/rcpinstall.properties"
RECORDED_WORDS = CONFIG + "/args.properties"
LOCK = WORKSPACE + "/.rcp.lock"
LOG = WORKSPACE + "/logs/velmora.log"

SCRIPT = "/mnt/example/installation.sh"
SUPERVISOR = [JAVA, "-cp", PLUGINS + "/velmora-demo.jar", "velmora.demo.Supervisor", WORKSPACE]


def read(path):
    return pathlib.Path(path).read_text(encoding="utf-8")


def lines(*texts):
    """The texts, each with a line end."""
    return "".join(text + "\n" for text in texts)


def launched(log=LOG):
    """The words of the started command, from the log: of the platform's, else of the provisioning application's."""
    text = read(log)
    for first, what, last in (("132", "Launch", "133"), ("129", "Provisioning", "130")):
        found = re.search("^QVMRL0%sI: ===== Begin %s Parameters =====\n(.*?)^QVMRL0%sI: ===== End %s Parameters =====$"
                          % (first, what, last, what), text, re.M | re.S)
        if found:
            return found.group(1).splitlines()
    raise AssertionError("no command in the log:\n" + text)


def reports(printed):
    """What each run of an application printed: a dictionary from the named rows to the lists of their values, and from
    "says" to its sentences."""
    found = []
    for line in printed.splitlines():
        if re.match("The (platform|provisioning application) runs", line):
            found.append({"says": []})
        assert found, "printed before the platform ran: " + line
        row = re.fullmatch(r"    (.{20})(.*)", line)
        if row is None:
            found[-1]["says"].append(line)
            continue
        name = row.group(1).strip()
        if name:
            found[-1][name] = values = []
        values.append(row.group(2))
    return found


class Start:
    """One start of the launcher, or of its supervisor. What it and the platform print is one text."""

    def __init__(self, process, output):
        self.pid = process.pid
        self._process, self._output = process, output

    def printed(self):
        size = os.fstat(self._output).st_size
        return os.pread(self._output, size, 0).decode("utf-8")

    def wait(self):
        """Waits for what was started, not for a platform that it left running."""
        assert self._process.wait(30) == 0, self.printed()
        return self

    def report(self):
        """The one report that was printed."""
        found = reports(self.printed())
        assert len(found) == 1, self.printed()
        return found[0]


class Example:
    def __init__(self, packed, uid):
        self._packed, self._uid = packed, uid

    def enter(self):
        """The first thing that happens in the world."""
        with tarfile.open(fileobj=io.BytesIO(self._packed)) as tar:
            for member in tar:
                member.uid, member.gid = self._uid, self._uid
                member.uname = member.gname = ""
                tar.extract(member, "/mnt")
        os.mkdir(HOME)
        self.script("example_install /mnt/pieces /mnt/velmora " + APP)

    def script(self, command, *words):
        """One of the functions that make the installation."""
        self._start(["bash", "-c", ". %s && %s" % (SCRIPT, command), "bash", *words], {}, "/mnt").wait()

    def configure(self, key, value):
        """Sets a line of velmora.properties."""
        self.script('example_configure "$@"', APP, key, value)

    def offer_provisioning(self):
        with open(APP + "/rcp/velmora.properties", "a", encoding="utf-8") as file:
            file.write(read("/mnt/example/provisioning.properties"))

    def start(self, *words, command=(LAUNCHER,), env=None):
        """Starts the launcher, and returns at once."""
        return self._start([*command, *words], env or {}, APP + "/rcp")

    def run(self, *words, **how):
        return self.start(*words, **how).wait()

    def _start(self, command, env, cwd):
        known = {"HOME": HOME, "USER": "anna", "LC_ALL": "C.UTF-8", "PATH": "/usr/bin:/bin", **env}
        known.update((name, os.environ[name]) for name in FOR_THE_BUILD if name in os.environ)
        output = os.memfd_create("output")
        process = subprocess.Popen(command, env=known, cwd=cwd, stdin=subprocess.DEVNULL, stdout=output, stderr=output,
                                   user=self._uid, group=self._uid)
        return Start(process, output)


def platforms_own(path):
    """Whether a path of the user area, relative to the workspace, is the platform's own business."""
    return re.match(r"\.metadata|\.config/org\.eclipse\.(?!update)", path) is not None


def user_area(workspace=WORKSPACE):
    """Every file, and every empty folder, that velmora made."""
    found = set()
    for folder, folders, files in os.walk(workspace):
        shown = os.path.relpath(folder, workspace)
        if not folders and not files:
            found.add(shown + "/")
        found.update(os.path.normpath(os.path.join(shown, name)) for name in files)
    return sorted(path for path in found if not platforms_own(path))


def ended(pid):
    """Waits until a process is gone, or dead and not yet buried."""
    until(lambda: state(pid) in (None, "Z", "X"), "process %d has ended" % pid)


def state(pid):
    fields = stat_fields(pid)
    return fields and fields[0]


def children_looked_at(pid):
    """Whether the process has waited for a child that did something: the sum of such children's page faults."""
    fields = stat_fields(pid)
    return bool(fields) and int(fields[8]) > 0


def stat_fields(pid):
    """The fields of /proc/PID/stat from the state on, or None when there is no such process."""
    try:
        return read("/proc/%d/stat" % pid).rpartition(")")[2].split()
    except (FileNotFoundError, ProcessLookupError):
        return None


def process_with(word):
    """The number of the oldest process that was started with the word, as soon as there is one."""

    def find():
        found = []
        for pid in filter(str.isdigit, os.listdir("/proc")):
            try:
                if word in read("/proc/%s/cmdline" % pid).split("\0"):
                    found.append(int(pid))
            except OSError:
                pass
        return found

    # A child of that process looks like it until it has become something else.
    return min(until(find, "a process has the word " + word))
