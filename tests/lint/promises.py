#!/usr/bin/env python3
"""Every comment "Deliberate:" and "Decision:" of the code has a row in promises.txt, and every row
a test that exists.

A row:   file | first words after "Deliberate:" or "Decision:" | test [, test ...]
A test:  unit tests as Suite.Name, the others as tests/launch/test_x.py::test_y
"""
import re

from tree import Cpp, Problems, files, read, sources

TABLE = "tests/lint/promises.txt"
MARK = re.compile(r"^//+\s*(Deliberate|Decision)\b:?\s*(.*)$", re.S)

problems = Problems()

tests = set()
for name in files():
    if name.startswith("tests/unit/") and name.endswith(".cpp"):
        text = read(name)
        tests.update(f"{suite}.{test}" for suite, test in re.findall(
            r"^\s*(?:TYPED_)?TEST(?:_[FP])?\(\s*(\w+)\s*,\s*(\w+)\s*\)", text, re.M))
    elif re.match(r"tests/(launch|real)/.*\.py$", name):
        tests.update(f"{name}::{test}" for test in re.findall(r"^def (test_\w+)", read(name), re.M))

rows = []  # [file, words, line, used]
for number, line in enumerate(open(TABLE, encoding="utf-8"), 1):
    if not line.strip() or line.startswith("#"):
        continue
    cells = [cell.strip() for cell in line.split("|")]
    if len(cells) != 3 or not all(cells):
        problems.add(TABLE, number, "a row is: file | first words | test, test ...")
        continue
    rows.append([cells[0], cells[1], number, False])
    for test in (word.strip() for word in cells[2].split(",")):
        if test not in tests:
            problems.add(TABLE, number, f"there is no test {test}")

found_any = False
for name in sources():
    file = Cpp(name)
    comments = []  # [offset, text]: neighbouring comment lines are one comment
    for offset, text in file.comments:
        flat = text.replace("///", "//").replace("//", "", 1).strip()
        if (comments and not MARK.match(text)
                and file.line(offset) == file.line(comments[-1][2]) + 1
                and not file.code[comments[-1][2]:offset].strip()):
            comments[-1][1] += " " + flat
            comments[-1][2] = offset
        else:
            comments.append([offset, text, offset])
    for offset, text, _ in comments:
        if not MARK.match(text):
            inner = re.search(r"\b(Deliberate|Decision):", text)
            if inner:
                problems.add(name, file.line(offset), f'"{inner.group()}" has to begin its comment line')
            continue
        found_any = True
        kind, words = MARK.match(" ".join(text.split())).groups()
        if not re.match(r"//+ (Deliberate|Decision): ", text):
            problems.add(name, file.line(offset), f'write it as "// {kind}: ..."')
        mine = [row for row in rows if row[0] == name and words.startswith(row[1])]
        if len(mine) != 1:
            problems.add(name, file.line(offset),
                         f'{len(mine)} rows in {TABLE} instead of one for "{kind}: {words[:60]}"')
        for row in mine:
            if row[3]:
                problems.add(name, file.line(offset),
                             f"row {row[2]} of {TABLE} names an earlier comment too: more words")
            row[3] = True

for file_name, words, number, was_used in rows:
    if not was_used:
        problems.add(TABLE, number, f'{file_name} has no such comment: "{words}"')
if not found_any:
    problems.add("launcher", 1, "no comment was found")
problems.end()
