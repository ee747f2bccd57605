#!/usr/bin/env python3
"""Messages: a text stands at one place, a number has one text, and a test names every number.

The exceptions are tables in this file, each with its reason; a row that is no longer true is a
problem too.
"""
import collections
import re

from tree import Cpp, Problems, files, read, sources

ID = re.compile(r"QVMRL\w*")
WELL_FORMED = re.compile(r"QVMRL\d{4}[EIW]$")

# Numbers with more than one text: administrators search for the number and find all of them.
SEVERAL_TEXTS = {
}

# Texts that stand at more than one place.
SEVERAL_PLACES = {
}

# Numbers that no test can bring about, and why.
UNREACHABLE = {
}

HERE = "tests/lint/messages.py"
problems = Problems()
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
    expected = SEVERAL_TEXTS.get(number, 1)
    if len(found) != expected:
        for text, several in found.items():
            problems.add(*several[0], f'{number} has {len(found)} texts instead of {expected}: "{text}"')
    for text, several in found.items():
        if len(several) != SEVERAL_PLACES.get(text, 1):
            for place in several:
                problems.add(*place, f'this text stands at {len(several)} places: "{text}"')
    if number in UNREACHABLE:
        continue
    if number not in tested:
        problems.add(*places[0], f"{number}: no test names it")

everything = {text for found in texts.values() for text in found}
for number in [*SEVERAL_TEXTS, *UNREACHABLE]:
    if number not in texts:
        problems.add(HERE, 1, f"{number} is in a table here, and nowhere in the code")
for text in SEVERAL_PLACES:
    if text not in everything:
        problems.add(HERE, 1, f'"{text}" is in a table here, and nowhere in the code')
if not texts:
    problems.add("launcher", 1, "no message was found")
problems.end()
