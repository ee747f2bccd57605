#!/usr/bin/env python3
"""Messages: a text stands at one place, a number has one text, and a test names every number.

The exceptions are rows of messages.txt; a row that is no longer true is a problem too.
"""
import collections
import re

from tree import Cpp, Problems, files, read, sources

ID = re.compile(r"QVMRL\w*")
# Two lines were never given a number of their own, and keep the two letters in its place.
WELL_FORMED = re.compile(r"QVMRL(?:\d{4}[EIW]|00XXI)$")

TABLE = "tests/lint/messages.txt"
problems = Problems()
several_texts = {}   # number: how many
several_places = {}  # (number, beginning of the text): how many
unreachable = set()
rows = {}            # number: line of a row
for number, line in enumerate(open(TABLE, encoding="utf-8"), 1):
    if not line.strip() or line.startswith("#"):
        continue
    row = re.match(r"(QVMRL\w+)\s+(?:(\d+) texts|(\d+) places of \"(.*)\"|unreachable: \S.*)$", line.strip())
    if not row:
        problems.add(TABLE, number, "a row is as the head of the file says")
        continue
    rows[row.group(1)] = number
    if row.group(2):
        several_texts[row.group(1)] = int(row.group(2))
    elif row.group(3):
        several_places[row.group(4)] = [int(row.group(3)), number, 0]
    else:
        unreachable.add(row.group(1))

texts = collections.defaultdict(lambda: collections.defaultdict(list))
names = sources()
for name in names:
    for line, literal in Cpp(name).literals():
        for found in ID.finditer(literal):
            number = found.group()
            if not WELL_FORMED.match(number):
                problems.add(name, line, f"{number}: four digits and E, I or W make a number")
            texts[number][literal].append((name, line))

tested = set()
for name in files():
    if name.startswith(("tests/unit/", "tests/launch/", "tests/real/")):
        tested.update(ID.findall(read(name)))

for number, found in sorted(texts.items()):
    places = sorted(place for several in found.values() for place in several)
    expected = several_texts.get(number, 1)
    if len(found) != expected:
        for text, several in found.items():
            problems.add(*several[0], f'{number} has {len(found)} texts instead of {expected}: "{text}"')
    for text, several in found.items():
        allowed = several_places.get(text, [1, 0, 0])
        allowed[2] = len(several)
        if len(several) != allowed[0]:
            for place in several:
                problems.add(*place, f'this text stands at {len(several)} places: "{text}"')
    if number in tested and number in unreachable:
        problems.add(TABLE, rows[number], f"{number} is unreachable here, and a test names it")
    elif number not in tested and number not in unreachable:
        problems.add(*places[0], f"{number}: no test names it")

for number, line in rows.items():
    if number not in texts:
        problems.add(TABLE, line, f"{number} is nowhere in the code")
for text, (_, line, seen) in several_places.items():
    if not seen:
        problems.add(TABLE, line, f'"{text}" is nowhere in the code')
if not texts:
    problems.add("launcher", 1, "no message was found")
problems.end()
