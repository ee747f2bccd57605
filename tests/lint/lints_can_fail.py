#!/usr/bin/env python3
"""A lint that cannot fail is worth nothing. A small clean tree passes every lint; then one thing
at a time is broken in it, and the lint has to name the file and the line.
"""
import os
import re
import shutil
import subprocess
import sys
import tempfile

LINTS = os.path.dirname(os.path.abspath(__file__))

LOG_H = """// What is told.
#ifndef DIAG_LOG_H
#define DIAG_LOG_H

/// Written by main, read by all.
extern bool loud;

void tell(const char* text);

#endif
"""
LOG_CPP = """#include "diag/log.h"

bool loud = false;
static int told;

void tell(const char* text)
{
    // Deliberate: an empty text counts too.
    if (text != nullptr && !loud)
        ++told;
    if (told == 1000000)
        __builtin_trap();
}
"""
FILES_H = """// What the system offers.
#ifndef PLATFORM_LINUX_FILES_H
#define PLATFORM_LINUX_FILES_H

/// Removes it, or says why not.
bool removeFile(const char* path);

#endif
"""
FILES_CPP = """#include "platform/linux/files.h"

#include <cerrno>
#include <unistd.h>

#include "diag/log.h"

bool removeFile(const char* path)
{
    if (unlink(path) == 0)
        return true;
    tell(errno == 0 ? "" : "QVMRL0001E: cannot be removed");
    return false;
}
"""
STARTUP_H = """// What happens, in which order.
#ifndef LAUNCHER_STARTUP_H
#define LAUNCHER_STARTUP_H

void startup(const char* path);

#endif
"""
STARTUP_CPP = """#include "launcher/startup.h"

#include "platform/linux/files.h"

void startup(const char* path)
{
    removeFile(path);
}
"""
MAIN_CPP = """#include "launcher/startup.h"

int main(int argc, char** argv)
{
    startup(argv[argc - 1]);
    return 0;
}
"""
UNIT_TEST = """TEST(tell, CountsAnEmptyText)
{
    EXPECT_FATAL(removeFile("/none"), "QVMRL0001E");
}
"""
CLEAN = {
    "diag/log.h": LOG_H,
    "diag/log.cpp": LOG_CPP,
    "platform/linux/files.h": FILES_H,
    "platform/linux/files.cpp": FILES_CPP,
    "launcher/startup.h": STARTUP_H,
    "launcher/startup.cpp": STARTUP_CPP,
    "launcher/main.cpp": MAIN_CPP,
    "tests/unit/log_test.cpp": UNIT_TEST,
    "tests/lint/globals.txt": "loud diag/log shared\ntold diag/log static\n",
    "tests/lint/messages.txt": "# none\n",
    "tests/lint/long_functions.txt": "# none\n",
    "tests/lint/promises.txt": "diag/log.cpp | an empty text | tell.CountsAnEmptyText\n",
    "CONTRIBUTING.md": "| File | About |\n|---|---|\n| **diag/** | |\n| `log` | told |\n"
                       "| **platform/linux/** | |\n| `files` | files |\n"
                       "| **launcher/** | |\n| `startup` | order |\n| `main.cpp` | entry |\n",
    "check": "#!/bin/sh\necho fine\n",
    ".clang-format": "BasedOnStyle: LLVM\nIndentWidth: 4\nColumnLimit: 100\n"
                     "BreakBeforeBraces: Linux\nPointerAlignment: Left\nIncludeBlocks: Preserve\n"
                     "AllowShortFunctionsOnASingleLine: None\n",
    ".clang-tidy": "Checks: '-*,modernize-use-nullptr'\n",
}

SPEC = "spe" + "c"


def startup_of(lines):
    return "void startup(const char* path)\n{\n" + "    removeFile(path);\n" * (lines - 3) + "}\n"


# (lint, file, what stands there, what is put in its place, what the lint must print).
# An empty "what stands there" appends; an empty "must print" is a bound that is still kept.
BREAKAGES = [
    ("floors", "diag/log.cpp", '#include "diag/log.h"\n',
     '#include "diag/log.h"\n#include "platform/linux/files.h"\n', r"diag/log\.cpp:2: .*lies above"),
    ("floors", "platform/linux/files.h", "/// Removes",
     '#include "launcher/startup.h"\n/// Removes', r"linux/files\.h:5: .*lies above"),
    ("floors", "launcher/startup.cpp", '"platform/linux/files.h"', '"files.h"',
     r"startup\.cpp:3: .*no header of the tree"),
    ("floors", "launcher/startup.cpp", '"platform/linux/files.h"', "<platform/linux/files.h>",
     r"startup\.cpp:3: .*with quotes"),
    ("floors", "platform/linux/files.cpp", '#include "platform/linux/files.h"\n\n#include <cerrno>',
     '#include <cerrno>\n#include "platform/linux/files.h"', r"files\.cpp:1: .*first include"),
    ("floors", "diag/clock.h", None,
     '// Time.\n#ifndef DIAG_CLOCK_H\n#define DIAG_CLOCK_H\n#include "diag/log.h"\n#endif\n', None),
    ("floors", "diag/log.cpp", '#include "diag/log.h"\n',
     '#include "diag/log.h"\n#include "diag/clock.h"\n', r"a circle: diag/\w+ -> diag/\w+ -> diag/\w+"),

    ("globals", "diag/log.cpp", "static int told;", "static int told;\nint more;",
     r"diag/log\.cpp:1: the global more is not in"),
    ("globals", "diag/log.cpp", "static int told;", "int told;",
     r"diag/log\.cpp:1: the global told has to be static"),
    ("globals", "diag/log.cpp", "        ++told;",
     "        for (static int inner = 0; inner < 3; ++inner)\n            ++told;",
     r"diag/log\.cpp:1: the global tell::inner is not in"),
    ("globals", "launcher/main.cpp", "int main", "bool late[4];\nint main",
     r"launcher/main\.cpp:1: the global late is not in"),
    ("globals", "launcher/startup.cpp", "void startup", "extern const int limits[];\n"
     "const int limits[] = {1, 2};\nvoid startup", r"startup\.cpp:1: the global limits is not in"),
    ("globals", "launcher/startup.cpp", "void startup", "extern bool loud;\nvoid startup",
     r"startup\.cpp:5: loud is declared here"),
    ("globals", "tests/lint/globals.txt", "told diag/log", "told platform/linux/files",
     r"diag/log\.cpp:1: the global told lives in platform/linux/files, not here"),
    ("globals", "tests/lint/globals.txt", "", "gone diag/log shared\n",
     r"globals\.txt:3: diag/log\.cpp has no global gone"),
    ("globals", "tests/lint/globals.txt", "", "gone diag/none shared\n",
     r"globals\.txt:3: diag/none\.cpp does not exist"),
    ("globals", "tests/lint/globals.txt", "told diag/log static", "told diag/log constant",
     r"told is a constant, and can be written here"),

    ("words", "check", "echo fine", f"echo fine # as the {SPEC} says", r"check:2: .*does not have"),
    ("words", "check", "echo fine", "echo fine # Pa" "rt 3.1", r"check:2: .*does not have"),
    ("words", "check", "echo fine", f"echo fine # {SPEC.upper()}IFICATION", r"check:2: .*not have"),
    ("words", "check", "echo fine", "cat ../sha" "red/x", r"check:2: .*does not have"),
    ("words", "check", "echo fine", "cat /wo" "rk/main/x", r"check:2: .*one machine"),
    ("words", "check", "echo fine", "cat /ro" "ot/x", r"check:2: .*one machine"),
    ("words", "check", "echo fine", "curl http://de" "b.debian.org/x", r"check:2: .*packages"),
    ("words", f"docs/{SPEC}.txt", None, "x\n", rf"docs/{SPEC}\.txt:1: the file's name"),

    ("messages", "tests/unit/log_test.cpp", "QVMRL0001E", "QVMRL0002E",
     r"files\.cpp:12: QVMRL0001E: no test names it"),
    ("messages", "diag/log.cpp", "void tell", 'static const char* const other = "QVMRL0001E: else";\n'
     "void tell", r"diag/log\.cpp:6: QVMRL0001E has 2 texts instead of 1"),
    ("messages", "diag/log.cpp", "void tell", 'static const char* const o = "QVMRL0001E: "\n'
     '                             "cannot be removed";\nvoid tell',
     r"diag/log\.cpp:6: this text stands at 2 places"),
    ("messages", "platform/linux/files.cpp", "QVMRL0001E", "QVMRL001E", r"files\.cpp:12: .*four digits"),
    ("messages", "tests/lint/messages.txt", "", "QVMRL0001E unreachable: never\n",
     r"messages\.txt:2: QVMRL0001E is unreachable here"),
    ("messages", "tests/lint/messages.txt", "", "QVMRL0009E 2 texts\n",
     r"messages\.txt:2: QVMRL0009E is nowhere"),
    ("messages", "tests/lint/messages.txt", "", 'QVMRL0001E 2 places of "gone"\n',
     r'messages\.txt:2: "gone" is nowhere'),

    ("promises", "tests/unit/log_test.cpp", "CountsAnEmptyText", "CountsNothing",
     r"promises\.txt:1: there is no test tell\.CountsAnEmptyText"),
    ("promises", "diag/log.cpp", "++told;", "++told;  // Decision: no more than that.",
     r"log\.cpp:10: 0 rows .* instead of one"),
    ("promises", "diag/log.cpp", "++told;", "++told;\n    // Deliberate: an empty text again.\n    ;",
     r"log\.cpp:11: row 1 .* earlier comment"),
    ("promises", "diag/log.cpp", "Deliberate: an empty", "It is so. Deliberate: an empty",
     r"log\.cpp:8: .*has to begin"),
    ("promises", "diag/log.cpp", "    // Deliberate: an empty text counts too.\n", "",
     r"promises\.txt:1: diag/log\.cpp has no such comment"),

    ("edge", "launcher/startup.cpp", "removeFile(path);", "unlink(path);", r"startup\.cpp:7: unlink belongs"),
    ("edge", "launcher/startup.cpp", "removeFile(path);", "errno = 0;", r"startup\.cpp:7: errno belongs"),
    ("edge", "launcher/startup.cpp", "removeFile(path);", "struct stat s;\n    stat(path, &s);",
     r"startup\.cpp:8: stat belongs"),
    ("edge", "launcher/startup.cpp", "removeFile(path);", "dlopen(path, 1);", r"startup\.cpp:7: dlopen belongs"),
    ("edge", "launcher/startup.cpp", "removeFile(path);", "chdir(path);", r"startup\.cpp:7: chdir belongs"),
    ("edge", "diag/log.cpp", "        ++told;", "        std::cout << 1;", r"log\.cpp:10: .*no console"),
    ("edge", "diag/log.cpp", "        ++told;", '        printf("x");', r"log\.cpp:10: .*no console"),
    ("edge", "diag/log.cpp", "        ++told;", "        throw 1;", r"log\.cpp:10: nothing throws"),
    ("edge", "diag/log.h", "void tell", "#ifdef _WIN32\n#endif\nvoid tell", r"log\.h:8: .*other systems"),
    ("edge", "diag/log.h", "DIAG_LOG_H\n\n", "DIAG_LOG_H\n#define BAIL if (loud) return\n", r"log\.h:4: .*macro"),
    ("edge", "diag/log.h", "#ifndef DIAG_LOG_H", "#ifndef LOG_H", r"log\.h:1: .*guard"),
    ("edge", "diag/string_util.h", None, "// It.\n#ifndef DIAG_STRING_UTIL_H\n#endif\n",
     r"string_util\.h:1: .*without a subject"),

    ("shape", "diag/log.cpp", "", "\n" * 290, r"log\.cpp:301: 303 lines"),
    ("shape", "diag/log.cpp", "", "\n" * (300 - LOG_CPP.count("\n")), ""),
    ("shape", "launcher/startup.cpp", STARTUP_CPP[STARTUP_CPP.index("void"):], startup_of(61),
     r"startup\.cpp:5: startup has 61 lines"),
    ("shape", "launcher/startup.cpp", STARTUP_CPP[STARTUP_CPP.index("void"):], startup_of(60), ""),
    ("shape", "tests/lint/long_functions.txt", "", "launcher/startup.cpp startup it walks\n",
     r"long_functions\.txt:2: .*not long"),
    ("shape", "diag/log.cpp", "Deliberate: an empty", "Deliberate: " + "an " * 40 + "empty", r"log\.cpp:8: .*columns"),
    ("shape", "diag/log.cpp", "++told;", "++told; ", r"log\.cpp:10: a tab"),
    ("shape", "diag/log.cpp", "        ++told;", "        ++told;\n    // ---- more ----", r"log\.cpp:11: no section"),
    ("shape", "diag/log.cpp", "        ++told;", "        ++told;\n    // told = 0;", r"log\.cpp:11: code that"),
    ("shape", "diag/clock.cpp", None, "int now();\n", r"clock\.cpp:1: its header is missing"),
    ("shape", "diag/log.h", "// What is told.\n", "", r"log\.h:1: a header begins"),

    ("listing", "CONTRIBUTING.md", "| `files` | files |\n", "", r"files\.cpp:1: .*does not list it"),
    ("listing", "CONTRIBUTING.md", "`files`", "`file`", r"CONTRIBUTING\.md:6: there is no platform/linux/file$"),
    ("listing", "CONTRIBUTING.md", "", "", ""),

    ("shell", "check", "echo fine", "echo $1", r"check:2:\d+: note: .*SC2086"),
    ("format", "diag/log.cpp", "        ++told;", "  ++told;", r"log\.cpp:9:.*clang-format|log\.cpp:9:"),
    ("clang_tidy", "diag/log.cpp", "nullptr", "0", r"log\.cpp:9:.*modernize-use-nullptr"),
    ("clang_tidy", "diag/unbuilt.cpp", None, "\n", r"diag/unbuilt\.cpp:1: it is not part"),
]

GOOD_FLAGS = ["-O2", "-fPIE", "-fstack-protector-strong", "-D_FORTIFY_SOURCE=2"]
GOOD_LINK = ["-pie", "-Wl,-z,relro,-z,now", "-static-libstdc++", "-static-libgcc"]
PROGRAM = """#include <cstdio>
#include <cstdlib>
#include <exception>
#include <string>
#ifndef SPEAKS
void __gnu_cxx::__verbose_terminate_handler()
{
    abort();
}
#endif
int main(int argc, char** argv)
{
    char text[64];
    std::string all;
    for (int i = 0; i < argc; ++i) {
        sprintf(text, "%s", argv[i]);
        all += text;
    }
    return all.size() > 1000;
}
"""
# (flags, link flags, what the lint must print; None: it is content)
EXECUTABLES = [
    (GOOD_FLAGS, GOOD_LINK, None),
    (GOOD_FLAGS, ["-no-pie", *GOOD_LINK[1:]], "not position-independent"),
    (GOOD_FLAGS, ["-pie", "-Wl,-z,norelro,-z,now", *GOOD_LINK[2:]], "no RELRO"),
    (GOOD_FLAGS, ["-pie", "-Wl,-z,relro,-z,lazy", *GOOD_LINK[2:]], "not bound before main"),
    (GOOD_FLAGS[:2] + ["-fno-stack-protector", GOOD_FLAGS[3]], GOOD_LINK, "no stack protector"),
    (GOOD_FLAGS[:3] + ["-U_FORTIFY_SOURCE"], GOOD_LINK, "no fortified call"),
    (GOOD_FLAGS, GOOD_LINK[:2], "it needs the C library alone"),
    (GOOD_FLAGS, [*GOOD_LINK, "-Wl,-rpath,/opt"], "a search path of its own"),
    (GOOD_FLAGS, [*GOOD_LINK, "-Wl,-z,execstack"], "the stack can be executed"),
    ([*GOOD_FLAGS, "-DSPEAKS"], GOOD_LINK, "a word to say on standard error"),
]

failures = []


def write(name, text):
    os.makedirs(os.path.dirname(name) or ".", exist_ok=True)
    with open(name, "w", encoding="utf-8") as file:
        file.write(text)


def lint(name, *arguments):
    program = [one for one in (f"{LINTS}/{name}.py", f"{LINTS}/{name}.sh") if os.path.exists(one)][0]
    done = subprocess.run([program, *arguments], capture_output=True, text=True, check=False)
    return done.returncode, done.stdout + done.stderr


def build_objects():
    """What build/native is for the lint of the globals, and for clang-tidy."""
    objects = []
    commands = []
    for name in ("diag/log.cpp", "platform/linux/files.cpp", "launcher/startup.cpp", "launcher/main.cpp"):
        target = f"build/native/CMakeFiles/velmora.dir/{name}.o"
        os.makedirs(os.path.dirname(target), exist_ok=True)
        subprocess.run(["g++", "-I.", "-O0", "-c", name, "-o", target], check=True)
        objects.append(target)
        commands.append(f'{{"directory": "{os.getcwd()}", "file": "{os.getcwd()}/{name}",'
                        f' "command": "g++ -I. -c {name}"}}')
    library = "build/native/libvelmora_launcher.a"
    if os.path.exists(library):
        os.remove(library)
    subprocess.run(["ar", "rc", library, *objects[:3]], check=True)
    write("build/native/compile_commands.json", "[" + ",\n".join(commands) + "]\n")


def check_clean():
    for name in sorted({row[0] for row in BREAKAGES}):
        status, output = lint(name)
        if status != 0:
            failures.append(f"{name}: the clean tree does not pass:\n{output}")


def check_breakage(name, path, old, new, expected):
    if old is None:
        write(path, new)
    else:
        with open(path, encoding="utf-8") as file:
            text = file.read()
        if old not in text:
            failures.append(f"{name}: {path} does not hold {old!r}: nothing was broken")
            return
        write(path, text.replace(old, new, 1) if old else text + new)
    if expected is None:
        return  # a first half: the next row breaks the rest
    if name == "globals":
        build_objects()
    status, output = lint(name)
    if (status == 0) != (expected == "") or not re.search(expected, output, re.M):
        failures.append(f"{name}: {path} was broken ({new!r}), status {status},"
                        f" expected {expected!r}, printed:\n{output}")


def restore():
    for name in os.listdir("."):
        if name not in ("build", ".git"):
            (shutil.rmtree if os.path.isdir(name) else os.remove)(name)
    for name, text in CLEAN.items():
        write(name, text)


def check_commit_message():
    def git(*words):
        subprocess.run(["git", "-c", "user.name=anna", "-c", "user.email=anna@localhost", *words],
                       check=True, capture_output=True)

    git("init", "-q")
    write(".gitignore", "/build/\n")
    git("add", ".")
    git("commit", "-q", "-m", "A start")
    status, output = lint("words")
    if status != 0:
        failures.append(f"words: the clean history does not pass:\n{output}")
    git("commit", "-q", "--allow-empty", "-m", f"As the {SPEC} has it")
    status, output = lint("words")
    if status != 1 or not re.search(r"commit \w+:1: .*does not have", output):
        failures.append(f"words: the commit message was not seen:\n{output}")


def check_executables():
    write("program.cpp", PROGRAM)
    for flags, link, expected in EXECUTABLES:
        subprocess.run(["g++", *flags, "program.cpp", "-o", "program", *link], check=True)
        status, output = lint("hardening", "program")
        if (status != 0) if expected is None else (status != 1 or expected not in output):
            failures.append(f"hardening: {flags} {link}: status {status}, expected {expected!r},"
                            f" printed:\n{output}")
    status, output = lint("hardening", "absent")
    if status != 1 or "absent:1: it is not built" not in output:
        failures.append(f"hardening: an absent executable: status {status}:\n{output}")
    # The narrow calls only exist in 32 bits, where a compiler for them is installed.
    os.makedirs("i686", exist_ok=True)
    write("narrow.cpp", '#include <cstdio>\nint main() { return fopen("x", "r") != nullptr; }\n')
    narrow = ["g++", "-m32", *GOOD_FLAGS, "narrow.cpp"]
    if subprocess.run([*narrow, "-c", "-o", "i686/narrow.o"], capture_output=True, check=False).returncode == 0:
        subprocess.run([*narrow, "-o", "i686/program", *GOOD_LINK], check=True)
        subprocess.run(["ar", "rc", "i686/libnarrow.a", "i686/narrow.o"], check=True)
        status, output = lint("hardening", "i686/program")
        if status != 1 or "i686/program:1: narrow.o: fopen: the form without" not in output:
            failures.append(f"hardening: fopen in 32 bits: status {status}:\n{output}")


def main():
    with tempfile.TemporaryDirectory() as folder:
        os.chdir(folder)
        # The clean tree is no repository, whatever lies around it.
        os.environ["GIT_CEILING_DIRECTORIES"] = os.path.dirname(folder)
        for variable in ("GIT_DIR", "GIT_WORK_TREE", "GIT_INDEX_FILE"):
            os.environ.pop(variable, None)
        restore()
        build_objects()
        check_clean()
        for row in BREAKAGES:
            check_breakage(*row)
            if row[4] is not None:
                restore()
                if row[0] == "globals":
                    build_objects()
        check_commit_message()
        check_executables()
        os.chdir("/")
    for text in failures:
        print(f"tests/lint/lints_can_fail.py:1: {text}")
    return 1 if failures else 0


if __name__ == "__main__":
    sys.exit(main())
