#!/usr/bin/env python3
"""What only the system's edge may touch, and what nobody may.

Locale bytes, errno and the calls that hand them out occur in platform/linux/ and diag/, in main
and in the file that forks the provisioning run. Everything above speaks wide strings and bool.
"""
import os
import re

from tree import FLOORS, Cpp, Problems, sources

EDGE_FOLDERS = ("diag", "platform/linux")
EDGE_FILES = ("launcher/main.cpp", "launcher/provisioning_launch.cpp")
EDGE_WORDS = re.compile(
    r"\b(errno|l?stat|fstat|chdir|dlopen|dlsym|mbstowcs|wcstombs|mbrtowc|wcrtomb|fopen|opendir"
    r"|readdir|unlink|rmdir|mkdir|rename|readlink|getenv|setenv|unsetenv|flock|setlocale"
    r"|fork|execv|waitpid|system|popen)\s*(?:\(|\b(?<=errno))")

NOBODY = [
    (re.compile(r"\bstd::(?:cout|cerr|clog|wcout|wcerr|wclog)\b"),
     "the launcher has no console: write to the log"),
    (re.compile(r"\b(?:printf|puts|putchar|wprintf|perror)\s*\("),
     "the launcher has no console: write to the log"),
    (re.compile(r"\bthrow\b"), "nothing throws: return false, write a line, or fatalErrorA"),
    (re.compile(r"\bvirtual\b"), "no class hierarchy"),
    (re.compile(r"\btemplate\s*<"), "no templates of our own"),
    (re.compile(r"^[ \t]*#[ \t]*include[ \t]*<(?:filesystem|iostream|sys/socket\.h|thread)>", re.M),
     "this header brings names or globals that the launcher does not want"),
    (re.compile(r"^[ \t]*#[ \t]*(?:if|ifdef|elif|else)\b", re.M),
     "no other systems in here: another system gets its own folder beside linux/"),
    (re.compile(r"^[ \t]*#[ \t]*define\b[^\n]*(?:\\\n[^\n]*)*\b(?:return|exit)\b", re.M),
     "a macro must not hide a return or an exit"),
    (re.compile(r"^[ \t]*#[ \t]*pragma\b(?!\s+once)", re.M), "no pragmas"),
    (re.compile(r"\bNOLINT\b"), "nothing is switched off for one line"),
]

problems = Problems()
names = sources()
for name in names:
    file = Cpp(name)
    for pattern, text in NOBODY:
        for found in pattern.finditer(file.code):
            problems.add(name, file.line(found.start() + len(found.group())
                                         - len(found.group().lstrip())), text)
    # A header's guard is the one condition that it may hold.
    guards = re.findall(r"^[ \t]*#[ \t]*ifndef[ \t]+(\w+)", file.code, re.M)
    path_guard = re.sub(r"\W", "_", name).upper()
    if name.endswith(".cpp") and guards:
        problems.add(name, 1, "no conditional compilation in a source")
    elif name.endswith(".h") and guards != [path_guard]:
        problems.add(name, 1, f"the header's guard has to be {path_guard}")
    if os.path.dirname(name) in EDGE_FOLDERS or name in EDGE_FILES:
        continue
    for found in EDGE_WORDS.finditer(file.code):
        before = file.code[:found.start()].rstrip()
        if before.endswith((".", "->")):
            continue  # a member that happens to have the name
        problems.add(name, file.line(found.start()),
                     f"{found.group(1)} belongs to platform/linux/ and diag/")

for name in names:
    stem = os.path.splitext(os.path.basename(name))[0].lower()
    if re.search(r"(^|_)(util|utils|common|misc|helpers?)(_|$)", stem):
        problems.add(name, 1, "a file without a subject becomes the circle of all files")
if not names:
    problems.add(FLOORS[0], 1, "no source was found")
problems.end()
