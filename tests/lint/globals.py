#!/usr/bin/env python3
"""The globals of the objects are those of globals.txt: same name, same home, seen by the same.

    globals.py [LIBRARY MAIN-OBJECT]      (default: those of build/native)

What can be written counts, statics inside of functions included; so does a constant that other
files can see. Constants of one file, tables of words for example, are nobody's business.
"""
import glob
import os
import re
import subprocess
import sys

from tree import Cpp, Problems, sources

TABLE = "tests/lint/globals.txt"
SYMBOL = re.compile(r"^[0-9a-f]+ (?P<flags>.{7}) (?P<section>\S+)\t[0-9a-f]+\s+(?P<name>.*)$")
# The compiler's own: guards of statics, type information, reference-counted literals.
COMPILERS_OWN = re.compile(r"^(guard variable|vtable|typeinfo|VTT|DW\.ref|\.L|__gcov|_GLOBAL__|\.hidden)"
                           r"|^std::|^__gnu_cxx")

problems = Problems()
table = {}
for number, line in enumerate(open(TABLE, encoding="utf-8"), 1):
    words = line.split("#")[0].split()
    if not words:
        continue
    if len(words) != 3 or words[2] not in ("shared", "static", "constant"):
        problems.add(TABLE, number, "a row is: name, home, shared or static or constant")
        continue
    table[words[0]] = (words[1], words[2], number)

objects = sys.argv[1:] or (glob.glob("build/native/*.a")
                           + glob.glob("build/native/CMakeFiles/velmora.dir/launcher/main.cpp.o"))
if len(objects) < 2:
    problems.add("build/native", 1, "it is not built: there is no library, or no object of main")
    problems.end()

homes = {os.path.splitext(name)[0] for name in sources() if name.endswith(".cpp")}
short = {}
for home in homes:
    short.setdefault(os.path.basename(home), []).append(home)
for several in short.values():
    if len(several) > 1:
        problems.add(several[0] + ".cpp", 1, "two sources with this name: " + ", ".join(several))

seen = {}
home = None
dump = subprocess.run(["objdump", "-t", "-C", *objects], capture_output=True, text=True, check=True)
for line in dump.stdout.splitlines():
    member = re.match(r"^(\S+):\s+file format", line)
    if member:
        stem = os.path.basename(member.group(1)).split(".")[0]
        home = short.get(stem, [stem])[0]
        continue
    symbol = SYMBOL.match(line)
    if not symbol or "O" not in symbol.group("flags"):
        continue
    name = symbol.group("name").strip()
    name = name.removeprefix(".hidden ").removeprefix("(anonymous namespace)::")
    name = name.replace("[abi:cxx11]", "")
    name = re.sub(r"\(.*\)(?: const)?::", "::", name)  # a static inside of a function
    if COMPILERS_OWN.search(name):
        continue
    section = symbol.group("section")
    constant = section.startswith((".rodata", ".data.rel.ro"))
    shared = not symbol.group("flags").startswith("l")
    if section == "*UND*" or (constant and not shared and name not in table):
        continue
    seen.setdefault(name, []).append((home, shared, constant))

for name, found in sorted(seen.items()):
    row = table.get(name)
    for home, shared, constant in found:
        source = home + ".cpp"
        if row is None:
            problems.add(source, 1, f"the global {name} is not in {TABLE}")
        elif row[0] != home:
            problems.add(source, 1, f"the global {name} lives in {row[0]}, not here")
        elif row[1] == "constant":
            if not constant:
                problems.add(source, 1, f"{name} is a constant, and can be written here")
        elif constant:
            problems.add(source, 1, f"{name} is constant here: it never changes")
        elif shared != (row[1] == "shared"):
            problems.add(source, 1, f"the global {name} has to be {row[1]}")

# A variable that nothing reads is dropped by the compiler, and a constant may live in the code
# alone: then its name in the home is enough.
for name, (home, kind, number) in table.items():
    if home not in homes:
        problems.add(TABLE, number, f"{home}.cpp does not exist")
    elif name not in seen:
        if kind == "shared" or not re.search(rf"\b{name}\b", Cpp(home + ".cpp").code):
            problems.add(TABLE, number, f"{home}.cpp has no global {name}")

# Nobody declares by hand what a header declares.
for name in sources():
    file = Cpp(name)
    for found in re.finditer(r'^[ \t]*extern\b(?![ \t]*")[^;]*?\b(\w+)(?:\[[^]]*\])?[ \t]*;', file.code, re.M):
        row = table.get(found.group(1))
        subject = os.path.splitext(name)[0]
        if name.endswith(".cpp") or row is None or row[0] != subject or row[1] == "static":
            problems.add(name, file.line(found.start()),
                         f"{found.group(1)} is declared here, and is no shared global of this header")
problems.end()
