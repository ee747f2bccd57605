#!/usr/bin/env python3
"""CONTRIBUTING.md lists every file of the launcher in its folder, and none that does not exist."""
import os
import re

from tree import Problems, read, sources

PAGE = "CONTRIBUTING.md"
problems = Problems()
there = {os.path.splitext(name)[0] for name in sources()}
listed = set()
folder = None
for number, line in enumerate(read(PAGE).splitlines(), 1):
    heading = re.match(r"\| \*\*([\w/]+)/\*\* \|", line)
    row = re.match(r"\| `(\w+)(?:\.cpp)?` \|", line)
    if heading:
        folder = heading.group(1)
    elif not line.startswith("|"):
        folder = None
    elif row and folder:
        subject = f"{folder}/{row.group(1)}"
        listed.add(subject)
        if subject not in there:
            problems.add(PAGE, number, f"there is no {subject}")
for subject in sorted(there - listed):
    problems.add(subject + ".cpp", 1, f"{PAGE} does not list it")
if not listed:
    problems.add(PAGE, 1, "no file is listed")
problems.end()
