"""Counts what starts take and compares it with bench/counts.json; counts.sh is the way in.

A count may be a tenth above its figure, and a tenth below: one that has fallen further is no longer guarded by the
figure, which has to follow. Times are never compared.
"""

import argparse
import json
import os
import pathlib
import subprocess
import sys
import tempfile

sys.dont_write_bytecode = True
ROOT = pathlib.Path(__file__).resolve().parent.parent.parent
sys.path[:0] = [str(ROOT / name) for name in ("bench", "tests/launch", "tests/sweeps")]

import namespaces  # noqa: E402
import startup_counts  # noqa: E402
import startup_page  # noqa: E402
from startup_parts import COMPILED, STRICT, tree  # noqa: E402
from startup_world import SCENARIOS, Start, World  # noqa: E402

FIGURES = ROOT / "bench" / "counts.json"
BUILDS = ("native", "i686")
PARTS = ("stopwatch", "child", "libjli.so")
ANNA = 1000
LONGEST = 900


def parts():
    """What a world needs to start velmora, and nothing else."""
    with tempfile.TemporaryDirectory() as folder:
        for target in PARTS:
            source, words = COMPILED[target]
            subprocess.run([os.environ.get("CC", "cc"), *STRICT, *words, "-o", target, str(ROOT / "bench" / source)],
                           cwd=folder, check=True)
        files = {target: pathlib.Path(folder, target).read_bytes() for target in PARTS}
    return {"launchers": {build: (ROOT / "build" / build / "velmora").read_bytes() for build in BUILDS},
            "files": {**files, "naive.sh": b""}, "platform": tree(ROOT / "example" / "platform"), "java": {}}


def measure(pieces, names):
    """{start: its counts}"""
    World(pieces)
    os.sched_setscheduler(0, os.SCHED_OTHER, os.sched_param(0))  # nothing is timed
    starts = [Start(build, scenario) for build in BUILDS for scenario in SCENARIOS]
    found = {}
    for start in starts:
        if start.name in names:
            World.measure(start)  # what it has to begin with, and whether it works without a tool
            found[start.name] = startup_page.guarded(startup_counts.counted(start))
    return found


def problem(figure, count):
    """What is wrong with the count, or None. Whole numbers, so that the bounds are exact."""
    if figure is None:
        return "there is no figure for %d" % count
    if 10 * count > 11 * figure:
        return "%d, more than a tenth above %d" % (count, figure)
    if 10 * count < 9 * figure:
        return "%d, more than a tenth below %d: let the figure follow (tests/quick/counts.sh --write)" % (count, figure)
    return None


def problems(figures, found):
    """One row for each count: its name, and what is wrong with it."""
    return [("%s %s" % (start, kind), problem(figures.get(start, {}).get(kind), count))
            for start, counts in found.items() for kind, count in counts.items()]


def can_fail(found):
    """Whether the guard fails where it should: at both bounds, and for the counts of this tree when one of them grows or
    falls by what is just too much. What is missing, if it does not."""
    bounds = [(100, 110, True), (100, 111, False), (100, 90, True), (100, 89, False), (0, 0, True), (0, 1, False),
              (1, 2, False), (1, 0, False), (None, 1, False)]
    for figure, count, well in bounds:
        if (problem(figure, count) is None) != well:
            return "a figure of %s and a count of %d" % (figure, count)
    for start, counts in found.items():
        for kind, count in counts.items():
            for changed in [count * 11 // 10 + 1] + ([(9 * count - 1) // 10] if count else []):
                if sum(wrong is not None for _, wrong in problems(found, {start: {**counts, kind: changed}})) != 1:
                    return "%s %s: %d instead of %d" % (start, kind, changed, count)
    return None


def write(figures):
    rows = ["    %s: %s" % (json.dumps(start), json.dumps(counts)) for start, counts in figures.items()]
    FIGURES.write_text("{\n" + ",\n".join(rows) + "\n}\n")


def main():
    parser = argparse.ArgumentParser(description=__doc__, formatter_class=argparse.RawDescriptionHelpFormatter)
    parser.add_argument("--only", default="")
    parser.add_argument("--write", action="store_true")
    asked = parser.parse_args()
    names = [build + "-" + scenario for build in BUILDS for scenario in SCENARIOS]
    chosen = [name for name in names if name.startswith(asked.only)]
    figures = json.loads(FIGURES.read_text()) if FIGURES.is_file() else {}
    pieces = parts()
    found = namespaces.isolated(lambda: measure(pieces, chosen), ANNA, LONGEST)
    if asked.write:
        every = {**figures, **found}
        write({name: every[name] for name in names if name in every})
        figures = every
    rows = problems(figures, found) + [("the guard can fail", can_fail(found))]
    if not asked.only and sorted(figures) != sorted(names):
        rows.append(("bench/counts.json", "its rows are not those of the starts"))
    for name, wrong in rows:
        print("ok      " + name if wrong is None else "FAILED  %s: %s" % (name, wrong))
    failed = sum(wrong is not None for _, wrong in rows)
    print("%d passed, %d failed" % (len(rows) - failed, failed))
    return 0 if failed == 0 and found else 1


if __name__ == "__main__":
    sys.exit(main())
