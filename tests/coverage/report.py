#!/usr/bin/python3
"""The coverage of the launcher: which of its lines and branches the tests go through.

    tests/coverage/report.py COUNTERS...

Each COUNTERS is a folder with the counters of some runs (.gcda), each beside the compiler's notes (.gcno); what was gone
through in one of them is covered. Prints the figures, and fails when

  - a line is not covered, and tests/coverage/unreached.txt does not list it;
  - a line that is listed there is covered, or does not exist;
  - fewer than 95 % of the branches are covered.
"""

import collections
import json
import pathlib
import re
import subprocess
import sys

sys.dont_write_bytecode = True
ROOT = pathlib.Path(__file__).resolve().parent.parent.parent
sys.path.append(str(ROOT / "tests" / "sweeps"))

from pieces import sources_digest  # noqa: E402

LIST = pathlib.Path(__file__).resolve().parent / "unreached.txt"
LAUNCHER = ("diag", "platform", "launcher")
REQUIRED = 95  # per cent of the branches


class Source:
    """What was counted in one file."""

    def __init__(self, path):
        self.path = path
        self.text = (ROOT / path).read_text().splitlines()
        self.functions = {}
        self.lines = collections.Counter()
        self.branches = collections.Counter()  # (line, function, how manyth)

    def add(self, file):
        """Adds what gcov tells of it for one object; a header has several."""
        for function in file["functions"]:
            self.functions[function["name"]] = function["demangled_name"]
        seen = collections.Counter()
        for line in file["lines"]:
            number, name = line["line_number"], line.get("function_name", "")
            if not self.has_code(number):
                continue
            # The number that a killed process leaves may be a negative one.
            self.lines[number] += max(0, line["count"])
            for branch in line["branches"]:
                self.branches[number, name, seen[number, name]] += max(0, branch["count"])
                seen[number, name] += 1

    def has_code(self, number):
        """A bracket alone has none; what the compiler puts there is not the source's."""
        return re.sub(r"//.*|[{}();\s]", "", self.text[number - 1]) != ""

    def uncovered_lines(self):
        return [number for number, count in sorted(self.lines.items()) if not count]

    def uncovered_branches(self):
        """{line: how many}"""
        return collections.Counter(key[0] for key, count in self.branches.items() if not count)

    def words(self, number):
        """What names a line, wherever it stands."""
        return "%s | %s" % (self.path, self.text[number - 1].strip())


def objects(folder):
    """What gcov says about each object of the launcher below the folder, also of one in which nothing was run."""
    notes = [path for path in sorted(pathlib.Path(folder).rglob("*.gcno"))
             if path.relative_to(folder).parts[0] != "tests"]
    if not any(path.with_suffix(".gcda").is_file() for path in notes):
        sys.exit("no counters below %s" % folder)
    for path in notes:
        command = ["gcov", "--json-format", "--stdout", "--branch-probabilities", str(path)]
        answer = subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.DEVNULL, check=True)
        yield json.loads(answer.stdout)


def sources(folders):
    found = {}
    for folder in folders:
        for unit in objects(folder):
            for file in unit["files"]:
                path = pathlib.Path(unit["current_working_directory"], file["file"])
                if path.is_relative_to(ROOT) and path.relative_to(ROOT).parts[0] in LAUNCHER:
                    path = str(path.relative_to(ROOT))
                    found.setdefault(path, Source(path)).add(file)
    return [found[path] for path in sorted(found)]


def listed():
    """[(reason, [lines])] of the list. It is in paragraphs: first the reason, in lines that begin with "#"."""
    found = []
    for paragraph in LIST.read_text().strip().split("\n\n"):
        rows = paragraph.splitlines()
        reason = " ".join(row[1:].strip() for row in rows if row.startswith("#"))
        lines = [row for row in rows if not row.startswith("#")]
        if not reason or not lines or not all(" | " in line for line in lines):
            sys.exit("%s: a paragraph without a reason, or without lines \"file | text\":\n%s" % (LIST, paragraph))
        found.append((reason, lines))
    return found


def problems(measured):
    left, found = collections.Counter(line for _, lines in listed() for line in lines), []
    for source in measured:
        for number in source.uncovered_lines():
            words = source.words(number)
            if left[words] > 0:
                left[words] -= 1
            else:
                found.append("%s:%d: is not covered: %s" % (source.path, number, source.text[number - 1].strip()))
    found += ["listed, but covered or not there: " + words for words in left.elements()]
    return found


def share(covered, all_of_them):
    return "%.2f %% (%d of %d)" % (100 * covered / all_of_them, covered, all_of_them)


def main(folders):
    if not folders:
        print(__doc__.strip(), file=sys.stderr)
        return 2
    measured = sources(folders)
    lines = sum(len(source.lines) for source in measured)
    without = sum(len(source.uncovered_lines()) for source in measured)
    branches = sum(len(source.branches) for source in measured)
    not_taken = sum(sum(source.uncovered_branches().values()) for source in measured)
    for source in measured:
        for number, count in sorted(source.uncovered_branches().items()):
            print("branch not taken: %s:%d: %d: %s" % (source.path, number, count, source.text[number - 1].strip()))
    found = problems(measured)
    if 100 * (branches - not_taken) < REQUIRED * branches:
        found.append("fewer than %d %% of the branches are covered" % REQUIRED)
    for problem in found:
        print(problem)
    print("sources: " + sources_digest())
    print("lines: %s, %d listed with the reason" % (share(lines - without, lines), sum(len(of) for _, of in listed())))
    print("branches: %s" % share(branches - not_taken, branches))
    print("%d passed, %d failed" % (0 if found else 1, len(found)))
    return 1 if found else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
