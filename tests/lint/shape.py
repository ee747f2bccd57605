#!/usr/bin/env python3
"""A file holds at most 300 lines, a function fits a screen, each source has its header, and a
comment says why instead of drawing lines or keeping old code.
"""
import os
import re

from tree import Cpp, Problems, sources

FILE_LINES = 300
FUNCTION_LINES = 60
COLUMNS = 100

# A walk over a text, character by character, is longer than a screen because cutting it would
# hide its states. Those are listed with their reason; nothing else is.
TABLE = "tests/lint/long_functions.txt"

NO_HEADER = {"launcher/main.cpp"}  # nothing may call upward into it

OLD_CODE = re.compile(r"^//+\s*(?:(?:if|for|while|return|else)\b.*[;{)]|[\w:<>*&\s]+=[^=].*;|}\s*$)")
RULER = re.compile(r"[-=*#~_/]{4,}")
BARE_RULER = re.compile(r"^[/*\s]*[-=*#~_/]{4,}[/*\s]*$")

problems = Problems()
names = set(sources())
long_walks = {}  # (file, function): [line of the row, whether it was needed]
for number, line in enumerate(open(TABLE, encoding="utf-8"), 1):
    words = line.split(None, 2)
    if words and not line.startswith("#"):
        if len(words) != 3:
            problems.add(TABLE, number, "a row is: file, function, the reason")
            continue
        long_walks[words[0], words[1]] = [number, False]
for name in sorted(names):
    file = Cpp(name)
    lines = file.text.splitlines()
    if len(lines) > FILE_LINES:
        problems.add(name, FILE_LINES + 1, f"{len(lines)} lines, at most {FILE_LINES}: two subjects?")
    for number, line in enumerate(lines, 1):
        if len(line) > COLUMNS:
            problems.add(name, number, f"{len(line)} columns, at most {COLUMNS}")
        if line != line.rstrip() or "\t" in line:
            problems.add(name, number, "a tab, or a blank at the line's end")
    if not file.text.endswith("\n"):
        problems.add(name, len(lines), "the last line has no end")
    for function, first, last in file.functions():
        if last - first + 1 <= FUNCTION_LINES:
            continue
        if (name, function) in long_walks:
            long_walks[name, function][1] = True
            continue
        problems.add(name, first, f"{function} has {last - first + 1} lines, at most {FUNCTION_LINES}")
    for offset, comment in file.comments:
        # A header is a manual and may have headings; a source is one subject.
        if BARE_RULER.search(comment) or (name.endswith(".cpp") and RULER.search(comment)):
            problems.add(name, file.line(offset), "no section rulers: a file is one subject")
        if OLD_CODE.search(comment):
            problems.add(name, file.line(offset), "code that is commented out")
    if name.endswith(".cpp") and name not in NO_HEADER:
        if name[:-4] + ".h" not in names:
            problems.add(name, 1, "its header is missing")
    if name.endswith(".h"):
        if not lines or lines[0].startswith("#"):
            problems.add(name, 1, "a header begins with what the file is about")
        if name[:-2] + ".cpp" not in names:
            problems.add(name, 1, "its source is missing")

for (name, function), (number, needed) in long_walks.items():
    if not needed:
        problems.add(TABLE, number, f"{name}: {function} is not long: take it off the list")
if not names:
    problems.add("launcher", 1, "no source was found")
problems.end()
