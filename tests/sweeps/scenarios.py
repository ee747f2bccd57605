"""The starts that are disturbed, and how a disturbed one is judged.

A problem is a short word with its subject, such as "missing:config.ini"; named.py tells which ones the required
behaviour itself brings about.
"""

import os
import re
import time

from lab import EXIT_DATA, LONGEST, UPDATE, write
from world import CONFIG, ECLIPSE, HOME, LOCK, USER_PROPERTIES, WORKSPACE, lines, read, user_logs, temp_logs

FATAL = re.compile(r"QVMRL[0-9]{4}E")


class Scenario:
    def __init__(self, name, title, prepare, words=(), next_words=(), daemon=False, statuses=(0, 255), lasting=True,
                 starts_once=True, platform=None):
        self.name, self.title, self.prepare = name, title, prepare
        self.words, self.next_words = list(words), list(next_words)
        self.daemon, self.statuses = daemon, statuses
        self.lasting = lasting  # a platform stays until it is told to end
        self.starts_once = starts_once  # a platform that cannot be executed ends the start
        self._platform = platform  # what stands in the place of the platform during the disturbed start

    def spoil(self, lab):
        """What is otherwise than usual during the disturbed start."""
        if self._platform is not None:
            write(ECLIPSE, self._platform, 0o755)

    def mend(self, lab):
        """As usual again, for the starts after it."""
        if self._platform is not None:
            write(ECLIPSE, lab.pieces["stand_in"], 0o755)


def _first(lab):
    lab.install()
    lab.plan("wait", start=0)


def _grown(lab):
    """A user area in which a platform has run and ended."""
    assert lab.run() == (0, ""), "the first start of the scenario"
    lab.platforms()
    lab.end_platforms()


def _second(lab):
    lab.install()
    lab.plan("wait", start=0)
    _grown(lab)


def _daemon(lab):
    lab.install()
    _grown(lab)
    lab.hold()
    write(LOCK, "%d          " % lab.holder)
    write(WORKSPACE + "/.rcp.main", "%d    " % lab.holder)


def _provisioning(lab):
    lab.install("user", "provisioning=true", "provisioning.manifest.version=7", "provisioning.application=prov.app")
    lab.plan("append", USER_PROPERTIES, "provisioning.manifest.version=7\n")


def _reset(lab):
    """With everything that a reset carries over, clears and removes."""
    _second(lab)
    write(UPDATE + "/registry", lines("the registry", "of the update manager"))
    write(UPDATE + "/bookmarks.xml", lines("<bookmarks/>"))
    write(CONFIG + "bak/config.ini", "an old backup\n")
    write(CONFIG + "bakdeleteme0003/left", "over\n")
    write(WORKSPACE + "/.metadata/.plugins/state.one/a/b", "state\n")
    write(WORKSPACE + "/.metadata/.plugins/kept/c", "kept\n")


def _renewal(lab):
    """The user area was made by another installation."""
    _reset(lab)
    write(USER_PROPERTIES, read(USER_PROPERTIES).replace("rcp.install.id=abc", "rcp.install.id=old"))


def _kiosk(lab):
    lab.install("lockdown", preload=False)  # a library to preload would have a word to say in every shell
    lab.plan("write", EXIT_DATA, "shutdown")
    _grown(lab)


SCENARIOS = {scenario.name: scenario for scenario in (
    Scenario("first", "a first start", _first),
    Scenario("second", "a second start", _second),
    Scenario("daemon", "a start beside a running platform", _daemon, daemon=True),
    Scenario("provisioning", "a provisioning launch", _provisioning, lasting=False),
    Scenario("reset", "a reset", _reset, words=["-resetconfig"]),
    Scenario("renewal", "a start after the installation has changed", _renewal),
    Scenario("restart", "a restart", _second, words=["-restart", "-rcp_old_pid", "4711"]),
    Scenario("unstartable", "a platform that cannot be executed", _second, platform="no program", starts_once=False),
    Scenario("kiosk", "a kiosk pass", _kiosk, statuses=(0, 1, 255), lasting=False, starts_once=False),
)}


def prepare(lab, scenario):
    """Makes the scenario's user area, and learns from undisturbed starts what must come of it."""
    lab.no_plans()
    os.makedirs(HOME, exist_ok=True)
    scenario.prepare(lab)
    lab.forget_platforms()
    lab.keep()
    lab.before = lab.snapshot()
    lab.references = None
    references = []
    for words in (scenario.words, None):  # whether the start has done its work, or nothing at all
        lab.reset()
        if words is not None:
            scenario.spoil(lab)
            assert lab.run(*words) == (0, ""), "an undisturbed start"
            lab.platforms()
            scenario.mend(lab)
            lab.between = lab.snapshot()
        problems = follow_up(lab, scenario)
        assert problems == [], problems
        references.append(lab.snapshot())
    lab.references = references
    lab.reset()


def judge_end(lab, scenario, status, said):
    """What is wrong with the end of a disturbed start; and the line that it left, if it ended by itself."""
    problems, row = [], ""
    if said:
        problems.append("said:" + said)
    if status == "hang":
        return problems + ["hang"], row
    if status < 0:
        return problems + ["signal:%d" % -status], row
    if status not in scenario.statuses:
        problems.append("status:%d" % status)
    if status == 255:
        rows = [FATAL.search(line) for line in lab.last_lines()]
        rows = [found.group() for found in rows if found]
        if rows:
            row = rows[-1]
        else:
            problems.append("silent")
    elif not lab.platforms() and status == 0:
        text = "".join(read(path) for path in user_logs() + temp_logs())
        if "Unable to start " not in text and "Unable to execute " not in text:
            problems.append("nothing-started")
    return problems, row


def mains(platforms):
    return [platform for platform in platforms if "-useDaemon" not in platform.argv]


def _daemon_problems(platform, expected):
    named = platform.argv[platform.argv.index("-useDaemon") + 1]
    return [] if named == str(expected) else ["daemon-names-another"]


def _start_beside(lab, scenario, living):
    """A start while a platform lives: a daemon, or one that waits until the platform has ended. Returns what is wrong,
    and whether it has become the main process in the end."""
    before = len(lab.records())
    process = lab.start(*scenario.next_words)
    deadline = time.monotonic() + LONGEST
    while not process.ended(0.001) and not lab.waits_for_lock(process) and time.monotonic() < deadline:
        pass
    waited = not process.ended()
    new = lab.records()[before:] if waited else lab.platforms()[before:]
    problems = []
    if mains(new):
        problems.append("two-platforms")
    elif not waited:
        problems += _daemon_problems(new[0], living) if new else ["next-start:nothing"]
    if waited:
        lab.end_behind(process)
    else:
        lab.end_platforms()
    if not process.ended(LONGEST):
        process.kill()
        problems.append("next-start:hang")
    said = process.said()
    if said or process.status != 0:
        problems.append("next-start:%s %s" % (process.status, said))
    if waited and not mains(lab.platforms()[before:]):
        problems.append("next-start:not-main")
    lab.end_platforms()
    return problems, waited


def follow_up(lab, scenario):
    """The undisturbed starts after a disturbed one, and what is wrong with them and with the files in the end."""
    platforms = lab.platforms()
    problems = []
    if scenario.daemon:
        if mains(platforms):
            # From here on the lock file names the wrong platform.
            lab.end_platforms()
            return ["two-platforms"]
        lab.end_platforms()
        problems += _next_daemon(lab, scenario)
    else:
        living = [platform for platform in mains(platforms) if platform.alive()]
        if len(living) > 1:
            problems.append("two-platforms")
        became_main = False
        if living and scenario.lasting:
            found, became_main = _start_beside(lab, scenario, living[0].pid)
            problems += found
        else:
            lab.wait_for_end()
        if not became_main:
            problems += _next_main(lab, scenario)
    if lab.references is not None:
        problems += judge_files(lab)
    return problems


def _next_start(lab, scenario):
    before = len(lab.records())
    status, said = lab.run(*scenario.next_words)
    if status != 0 or said:
        rows = [FATAL.search(line) for line in lab.last_lines()]
        rows = [found.group() for found in rows if found]
        return ["next-start:%s %s%s" % (status, "".join(rows), said)], []
    new = lab.platforms()[before:]
    lab.end_platforms()
    return ([], new) if new else (["next-start:nothing"], [])


def _next_daemon(lab, scenario):
    problems, new = _next_start(lab, scenario)
    if new and mains(new):
        problems.append("two-platforms")
    elif new:
        problems += _daemon_problems(new[0], lab.holder)
    return problems


def _next_main(lab, scenario):
    problems, new = _next_start(lab, scenario)
    if new and not mains(new):
        problems.append("next-start:not-main")
    return problems


def _versions(lab):
    """What each file may hold."""
    versions = {".rcp.lock": {"0600 "}}  # an empty one says that there is no platform
    for snapshot in (lab.before, lab.between, *lab.references):
        for name, text in snapshot.items():
            versions.setdefault(name, set()).add(text)
    return versions


def short_for_now(lab):
    """The files that a killed start has left short under the names by which others look for them."""
    versions = _versions(lab)
    return sorted("short-for-now:" + name for name, text in lab.snapshot().items()
                  if name in versions and text not in versions[name])


def judge_files(lab):
    """Each file must be as undisturbed starts leave it, or as it was; nothing may be missing or left over."""
    problems = []
    found = lab.snapshot()
    versions = _versions(lab)
    for name in set(lab.references[0]) & set(lab.references[1]):
        if name not in found:
            problems.append("missing:" + name)
    for name, text in found.items():
        if not any(name in reference for reference in lab.references):
            whole = text in versions.get(name, ()) or any(
                text in versions[same] for same in versions if _plain_name(same) == _plain_name(name))
            problems.append(("left:" if whole else "left-short:") + name)
        elif text not in versions[name]:
            problems.append("short:" + name)
    if lab.history():
        problems.append("short:logs/shutdown.log")
    return sorted(problems)


def _plain_name(path):
    return path.rpartition("/")[2].removesuffix(".old")
