"""Installations of every size in one private world, and one measured start of each.

Runs inside namespaces.isolated: /mnt, /tmp and /dev/shm are file systems in memory that nobody else sees. A case is
one curve at one size in one width; its installation lies in a folder of its own and is used again for each start.
"""

import os
import pathlib
import shutil
import time

from startup_world import go_first, leave_privileges

FIFO = "/dev/shm/told"
ENOUGH = 60  # seconds that a platform may take to end


class Case:
    """One installation; subclasses say what grows in it."""

    name = unit = None
    sizes = ()

    def __init__(self, size, width, pieces):
        self.size, self.width = size, width
        self.top = "/mnt/%s/%d.%s" % (self.name, size, width)
        self.app, self.base, self.home = (self.top + "/" + name for name in ("app", "app/base", "home"))
        self.launcher = self.app + "/rcp/velmora"
        self.eclipse = self.base + "/linux/x86/eclipse"
        self.properties = self.app + "/rcp/velmora.properties"
        self.workspace = self.home + "/VANTOR/RCP/abc/anna"
        self.env = {"HOME": self.home, "USER": "anna", "LC_ALL": "C.UTF-8", "PATH": "/usr/bin:/bin"}
        self._install(pieces)
        self.expected = told(self.command())

    # ---- what grows

    def installed(self):
        """Further lines of velmora.properties."""
        return []

    def of_the_user(self):
        """Lines of the rcpinstall.properties that the user's copy is made from."""
        return []

    def words(self):
        """The launcher's words."""
        return []

    def main_options(self):
        """Words for the platform behind its areas."""
        return []

    def vm_options(self):
        """Words for the JVM in front of the launcher's own."""
        return []

    def properties_for_the_vm(self):
        """Words for the JVM behind the launcher's own."""
        return []

    def before(self):
        """What has to be made again before each start."""

    def verify(self):
        """What a start has to leave, besides the platform's words."""

    # ---- the start

    def command(self):
        """Every word that the platform has to get."""
        return [self.eclipse, "--launcher.suppressErrors", *self.words(),
                "-data", self.workspace, "-configuration", self.workspace + "/.config", *self.main_options(),
                "-startup", self.base + "/launcher.jar", "-vmargs", *self.vm_options(),
                "-Drcp.home=" + self.app, "-Drcp.data=" + self.workspace, "-Dcom.vantor.rcp.install.id=abc",
                "-Drcp.install.config=user", *self.properties_for_the_vm(),
                "-Drcp.osgi.install.area=" + self.app + "/rcp/eclipse"]

    def start(self, fifo):
        """Starts the launcher once; the seconds until it has ended, and those of the processor. Raises unless all of it
        has worked."""
        self.before()
        status, seconds = timed([self.launcher, *self.words()], self.env)
        number, _, answer = fifo.readline().partition(b" ")
        gone(int(number))
        if (status, answer) != (0, self.expected):
            raise RuntimeError("%s: status %s, told %r instead of %r" % (self.top, status, answer, self.expected))
        self.verify()
        return seconds

    def _install(self, pieces):
        _write(self.launcher, pieces["launcher"], 0o755)
        _write(self.eclipse, pieces["child"], 0o755)
        _write(self.properties, _lines("rcp.install.id=abc", "rcp.base.location=${rcp.home}/base",
                                       "install.configuration=user", *self.installed()))
        _write(self.base + "/rcpinstall.properties", _lines("resetDir.1=state.one", *self.of_the_user()))
        _write(self.base + "/config.ini", _lines("osgi.bundles=a,b"))
        _write(self.base + "/platform.xml", _lines("<config>", "</config>"))
        os.mkdir(self.home)


def timed(words, env, actions=()):
    """(status, (seconds until its end, seconds of the processor))"""
    began = time.perf_counter()
    pid = os.posix_spawn(words[0], words, env, file_actions=actions)
    _, status, used = os.wait4(pid, 0)
    return status, (time.perf_counter() - began, used.ru_utime + used.ru_stime)


def gone(number):
    """Waits until the platform has ended, so that the next start is not one beside it."""
    deadline = time.monotonic() + ENOUGH
    while os.path.exists("/proc/%d" % number):
        if time.monotonic() > deadline:
            raise RuntimeError("the platform %d does not end" % number)
        time.sleep(0.0002)


def _lines(*texts):
    return "".join(text + "\n" for text in texts).encode()


def _write(path, data, mode=0o644):
    os.makedirs(os.path.dirname(path), exist_ok=True)
    pathlib.Path(path).write_bytes(data)
    os.chmod(path, mode)


def told(command):
    """What growth_child.c tells of these words, behind its number."""
    found = 0xcbf29ce484222325
    for byte in b"".join(word.encode() + b"\0" for word in command):
        found = (found ^ byte) * 0x100000001b3 & 0xffffffffffffffff
    return b"%d %016x\n" % (len(command), found)


def sizes(largest):
    """0, and from 10 on two sizes for each decade."""
    return [0] + [round(10 ** (half / 2)) for half in range(2, 11) if 10 ** (half / 2) <= largest]


class Properties(Case):
    name, unit, sizes = "properties of the installation", "properties", sizes(100000)

    def installed(self):
        return ["key%d=the value of number %d" % (number, number) for number in range(self.size)] + ["product=last"]

    def main_options(self):
        return ["-product", "last"]


class UserProperties(Case):
    name, unit, sizes = "properties of the user", "properties", sizes(100000)

    def of_the_user(self):
        return ["key%d=the value of number %d" % (number, number) for number in range(self.size)] + ["-Dlast=1"]

    def properties_for_the_vm(self):
        return ["-Dlast=1"]


class Arguments(Case):
    name, unit, sizes = "arguments", "words", sizes(10000)

    def words(self):
        return ["word%d" % number for number in range(self.size)]


class VmArguments(Case):
    name, unit, sizes = "named VM arguments", "arguments", sizes(10000)

    def of_the_user(self):
        return ["vmarg.n%05d=-Xn%d" % (number, number) for number in range(self.size)]

    def vm_options(self):
        return ["-Xn%d" % number for number in range(self.size)]


class Placeholders(Case):
    """Ten in each value, all of the same property."""

    name, unit, sizes = "placeholders, ten in a value", "placeholders", sizes(100000)

    def of_the_user(self):
        whole, rest = divmod(self.size, 10)
        values = ["${prop.a}" * 10] * whole + ["${prop.a}" * rest] * (rest > 0)
        return ["a=1", *("key%d=%s" % pair for pair in enumerate(values)), "-Dlast=${prop.a}"]

    def properties_for_the_vm(self):
        return ["-Dlast=1"]


class OneValue(Case):
    """All of them in one value, which continues over many lines."""

    name, unit, sizes = "placeholders in one value", "placeholders", sizes(100000)

    def of_the_user(self):
        whole, rest = divmod(self.size, 200)
        pieces = ["${prop.a}" * 200] * whole + ["${prop.a}" * rest] * (rest > 0)
        return ["a=1", *("-Dmany=" + "\\\n".join([*pieces, "."])).split("\n")]

    def properties_for_the_vm(self):
        return ["-Dmany=" + "1" * self.size + "."]


class Names(Case):
    """Every value names another property, which stands far away."""

    name, unit, sizes = "placeholders of different names", "placeholders", sizes(100000)

    def of_the_user(self):
        return [*("key%d=${prop.value%d}" % (number, number) for number in range(self.size)),
                *("value%d=%d" % (number, number) for number in range(self.size)),
                "-Dlast=${prop.key%d}" % max(0, self.size - 1), "key0=0"]

    def properties_for_the_vm(self):
        return ["-Dlast=%d" % max(0, self.size - 1)]


class Files(Case):
    """A reset removes a plug-in's state: a hundred files in a folder, a hundred folders in a folder."""

    name, unit, sizes = "files to remove", "files", sizes(100000)

    def words(self):
        return ["-resetconfig"]

    def command(self):
        return [word for word in super().command() if word != "-resetconfig"]

    def before(self):
        if not os.path.isdir(self.workspace):  # the first start, which has nothing to reset
            return
        for number in range(self.size):
            folder = "%s/.metadata/.plugins/state.one/%d/%d" % (self.workspace, number // 10000, number // 100)
            if number % 100 == 0:
                os.makedirs(folder)
            os.mknod("%s/%d" % (folder, number))

    def verify(self):
        if os.path.lexists(self.workspace + "/.metadata/.plugins/state.one"):
            raise RuntimeError(self.top + ": the tree still stands")


CURVES = (Properties, UserProperties, Arguments, VmArguments, Placeholders, OneValue, Names, Files)


class Floor:
    """The program that reads a case's file and does nothing else."""

    def __init__(self, case, program):
        self.case, self.program = case, case.top + "/floor"
        _write(self.program, program, 0o755)
        lines = pathlib.Path(case.properties).read_bytes().splitlines()
        self.expected = b"%d %d\n" % (len(lines), sum(map(len, lines)))

    def start(self, _):
        out = os.memfd_create("out")
        status, seconds = timed([self.program, self.case.properties], self.case.env, [(os.POSIX_SPAWN_DUP2, out, 1)])
        said = os.pread(out, 1000, 0)
        os.close(out)
        if (status, said) != (0, self.expected):
            raise RuntimeError("the floor: status %s, %r instead of %r" % (status, said, self.expected))
        return seconds


def measure(pieces, chosen, rounds, order):
    """{(curve, width, size): [(seconds, of the processor)]}, and the floors as (None, width, size). `pieces` are programs by width;
    `order` puts the starts of a round in a new order."""
    go_first()
    leave_privileges()
    os.mkfifo(FIFO)
    fifo = os.fdopen(os.open(FIFO, os.O_RDWR | os.O_CLOEXEC), "rb", buffering=0)
    found = {}
    for curve in chosen:
        cases = {}
        for width in pieces:
            for size in curve.sizes:
                case = curve(size, width, pieces[width])
                cases[curve.name, width, size] = case
                for _ in range(2):  # the first start, which makes the user area, and one that warms up
                    case.start(fifo)
            if curve is Properties:
                cases[None, width, case.size] = Floor(case, pieces[width]["floor"])
        for _ in range(rounds):
            for key in order(list(cases)):
                found.setdefault(key, []).append(cases[key].start(fifo))
        shutil.rmtree("/mnt/" + curve.name)
    return found
