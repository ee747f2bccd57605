"""Which problems the required behaviour itself brings about. Each has its name, its reason and its consequence, which the
page shows. A case that has any other problem is a failure."""

import re

WORKSPACE = "/mnt/home/VANTOR/RCP/abc/anna/"
UPDATE = r"\.config/org\.eclipse\.update/"
NEXT_FATAL = r"next-start:255 QVMRL[0-9]{4}E|missing:\.rcp\.main|short:\.rcp\.lock"


class Named:
    def __init__(self, key, why, consequence, problems, kinds=(), scenarios=(), calls=(), path=None, when=None):
        self.key, self.why, self.consequence = key, why, consequence
        self._problems = re.compile("(?:%s)" % problems)
        self._kinds, self._scenarios, self._calls = kinds, scenarios, calls
        self._path = re.compile(path) if path is not None else None
        self._when = when

    def covers(self, kind, case, problem):
        def among(value, allowed):
            return not allowed or value in allowed

        path = case.get("path", "").removeprefix(WORKSPACE)
        return (self._problems.fullmatch(problem) is not None and among(kind, self._kinds)
                and among(case.get("scenario"), self._scenarios) and among(case.get("call"), self._calls)
                and (self._path is None or self._path.fullmatch(path) is not None)
                and (self._when is None or self._when(case)))


def _logged(*numbers):
    """Whether the case has left one of these lines."""
    return lambda case: not set(numbers).isdisjoint(case["lines"])


RENEWING = ("reset", "renewal")
OPENING = ("open", "openat")

# Where an error stays, the call that it began with may be another one than the one that matters.
NAMED = (
    Named("no-log",
          "A log that cannot be opened or written takes no line.",
          "The status alone tells that the start has failed.",
          "silent", ("lasting",), calls=("write",)),
    Named("no-log",  # what is opened before it, or is it; while it is open, a fatal end has its line
          "", "", "silent", ("lasting",), calls=OPENING,
          path=r"\.rcp\.lock|\.sid|logs/velmora\.log|/(etc|usr)/.*|/mnt/app/rcp/(velmora\.properties|prov\.debug/debug\.txt)"),
    Named("platform-not-seen",
          "A lock file of which the system says that it is not there holds no platform, and a process test that fails is "
          "a no.",
          "A second platform starts in the workspace while the first one runs. It takes a file system that denies a file "
          "that is there, or a shell that cannot do its work, at that very moment.",
          "two-platforms", ("errors", "lasting"), ("daemon",), calls=("access",), path=r"\.rcp\.lock",
          when=lambda case: case["what"] == "ENOENT"),
    Named("platform-not-seen",
          "", "", "two-platforms", ("errors", "lasting"), ("daemon",),
          calls=("mmap", "mmap2", "clone", "clone3", "vfork"), path=""),
    Named("number-not-recorded",
          "When the platform's number cannot be written into the lock file, not at the second try either, that is logged "
          "(QVMRL0051E), and the start goes on.",
          "The next start finds no number and starts a second platform while the first one runs.",
          "two-platforms", ("errors", "lasting"), calls=("write", "pwrite64", "lseek", "_llseek"), path=r"\.rcp\.lock",
          when=_logged("QVMRL0051E")),
    Named("restart-after-twenty-seconds",
          "A restart waits about 20 seconds for the old platform, then makes its number in the lock file invalid "
          "(QVMRL0013E) without holding the lock.",
          "Two platforms run while the old one lives on. Several such restarts within a second wipe out each other's "
          "numbers too, so that each starts a platform.",
          r"two-platforms|mains:\d+", ("storms",), when=lambda case: not case["ends"]),
    Named("user-properties-empty",
          "When the copy cannot be opened again (QVMRL0074E), the empty new file becomes the user's rcpinstall.properties.",
          "It is believed for ever: every later start ends with QVMRL0011E, until somebody removes the file.",
          NEXT_FATAL + r"|short:\.config/rcpinstall\.properties", ("errors",), calls=OPENING,
          path=r"\.config/rcpinstall\.properties\.(part|new)"),
    Named("user-properties-empty",
          "", "", NEXT_FATAL + r"|short:\.config/rcpinstall\.properties", ("memory",),
          when=lambda case: case["row"] == "QVMRL0011E" and case["asked"].startswith("libc")),
    Named("user-properties-short",
          "A failed write into the user's rcpinstall.properties is logged (QVMRL0001E, QVMRL0015E), a failed read counts "
          "as its end, and the file is put into place all the same.",
          "What is missing is missing for ever. Depending on the lines, later starts end with a message of their own "
          "(QVMRL0005E, QVMRL0011E, QVMRL0088E), until somebody removes the file.",
          NEXT_FATAL + r"|short:\.config/rcpinstall\.properties", ("errors",), calls=("read", "write", "fsync"),
          path=r"\.config/rcpinstall\.properties\.(part|new)",
          when=lambda case: case["call"] == "read" or _logged("QVMRL0001E", "QVMRL0015E")(case)),
    Named("user-properties-short",
          "", "", r"next-start:255 QVMRL0011E|missing:\.rcp\.main|short:\.config/rcpinstall\.properties", ("lasting",),
          calls=("read", "write"), path=r"\.config/rcpinstall\.properties\.(part|new)",
          when=lambda case: (case["call"] == "read") == case["path"].endswith(".part")),
    Named("user-properties-copy-left",
          "The results of the removal and the renaming at the end are not looked at.",
          "The plain copy stays beside the user's rcpinstall.properties. Nothing reads it.",
          r"left-short:\.config/rcpinstall\.properties\.part", ("errors",), calls=("unlink",),
          path=r"\.config/rcpinstall\.properties\.part"),
    Named("user-properties-copy-left",
          "", "", r"left-short:\.config/rcpinstall\.properties\.part", ("lasting",), calls=("unlink",)),
    Named("platform-xml-short",
          "A failed write into platform.xml is logged (QVMRL0103E), a failed read of the template counts as its end, and "
          "the lines so far stay.",
          "The short platform.xml is believed for ever, until a reset or until somebody removes it.",
          "short:" + UPDATE + r"platform\.xml", ("errors",), calls=("read", "write", "fsync"),
          path=r".*/platform\.xml(\.part)?",
          when=lambda case: case["call"] == "read" or _logged("QVMRL0103E")(case)),
    Named("platform-xml-short",
          "", "", "short:" + UPDATE + r"platform\.xml", ("lasting",), calls=("read", "write")),
    Named("words-short-for-now",
          "args.properties is written in its place, by every start but a restart.",
          "After a kill at that moment it is short until the next start writes it. A restart in between believes it.",
          r"short-for-now:\.config/args\.properties", ("kills",), path=r".*/args\.properties|/proc/self/exe"),
    Named("main-number-short-for-now",
          "The platform's number is written into .rcp.main in its place.",
          "After a kill at that moment .rcp.main is empty until the next start. The launcher never reads it.",
          r"short-for-now:\.rcp\.main", ("kills",), path=r"\.rcp\.main"),
    Named("extension-mark-short-for-now",
          "The shared .eclipseextension is copied in its place, by every start.",
          "After a kill at that moment it is short until the next start copies it.",
          r"short-for-now:applications/eclipse/\.eclipseextension", ("kills",), path=r".*/\.eclipseextension"),
    Named("saved-copies-left",
          "A reset saves the update registry and the bookmarks in the workspace, where they stay when it comes to its "
          "end before it has put them back.",
          "registry.old and bookmarks.xml.old stand in the workspace, each whole. A later reset makes them anew; but when "
          "the registry itself is gone by then, that reset takes a leftover for it. What was being copied ends in .part, "
          "and is not believed.",
          r"left:(registry|bookmarks\.xml)\.old|left(-short)?:(registry|bookmarks\.xml)\.old\.part",
          ("errors", "lasting", "kills"), RENEWING),
    Named("registry-not-carried-over",
          "A reset moves the configuration away before it puts the registry and the bookmarks back, a file that cannot "
          "be opened counts as absent, and a start without a configuration is a first one.",
          "The new configuration begins without the update registry and the bookmarks. They are kept in .configbak, and "
          "as registry.old and bookmarks.xml.old where they were saved.",
          "missing:" + UPDATE + r"(registry|bookmarks\.xml)|missing:platform\.xml\.old",
          ("errors", "lasting", "kills"), RENEWING),
    Named("older-backup-gone",
          "The older backup of the configuration is cleared before the configuration takes its place.",
          "Until the next reset there is no .configbak. The configuration itself is whole.",
          r"missing:\.configbak(/.*)?", ("errors", "lasting", "kills"), RENEWING),
    Named("cleared-backup-left",
          "What cannot be removed of an old backup that was moved aside is left without a word.",
          ".configbakdeleteme0001 to 0005 stay until a later reset removes them.",
          r"left(-short)?:\.configbakdeleteme000[1-5](/.*)?",
          ("errors", "lasting", "kills"), RENEWING),
    Named("log-shared",
          "velmora.log is begun anew by each launcher, and the last line of each is written after the lock was released.",
          "The last line of one launcher may stand in the middle of the next one's log, with zero bytes before it.",
          r"mixed:logs/velmora\.log", ("crowds", "storms")),
)


def judge(kind, case):
    """Fills in the case's verdict: passed, named (all of its problems are), or failed."""
    named = set()
    failed = False
    for problem in case["problems"]:
        key = next((entry.key for entry in NAMED if entry.covers(kind, case, problem)), None)
        failed = failed or key is None
        named |= {key} - {None}
    case["named"] = sorted(named)
    case["verdict"] = "failed" if failed else "named" if named else "passed"
