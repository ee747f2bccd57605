#!/usr/bin/env python3
"""The executables are what an administrator may rely on: position-independent, everything
relocated before main, stack protector, fortified calls, the C library alone, and none of the
C++ library's own words, which would go to standard error.

    hardening.py [EXECUTABLE...]      (default: native and i686)
"""
import glob
import os
import re
import subprocess
import sys

from tree import Problems

# In 32 bits, the forms of these calls that cannot see large files or late times.
NARROW = {"fopen", "freopen", "open", "openat", "stat", "lstat", "fstat", "__xstat", "__lxstat",
          "__fxstat", "readdir", "lseek", "fseeko", "ftello", "mkstemp", "time", "localtime",
          "localtime_r", "gettimeofday", "clock_gettime", "nanosleep", "ftime", "utime", "utimes",
          "ftruncate", "truncate", "statvfs", "creat"}

problems = Problems()


def output(*command):
    return subprocess.run(command, capture_output=True, text=True, check=True,
                          env={**os.environ, "LC_ALL": "C"}).stdout


def look(name):
    def expect(true, text):
        if not true:
            problems.add(name, 1, text)

    if not os.access(name, os.X_OK):
        problems.add(name, 1, "it is not built")
        return
    header = output("readelf", "-W", "-h", name)
    segments = output("readelf", "-W", "-l", name)
    dynamic = output("readelf", "-W", "-d", name)
    imports = {re.sub(r"@.*", "", line.split()[7])
               for line in output("readelf", "-W", "--dyn-syms", name).splitlines()
               if " UND " in line and len(line.split()) > 7}
    needed = re.findall(r"\(NEEDED\).*\[(.*)\]", dynamic)

    narrow = "ELF32" in header
    if "/i686/" in name:
        expect(narrow and "80386" in header, "this is no 32-bit executable for x86")
    if "/native/" in name:
        expect("ELF64" in header, "this is no 64-bit executable")
    expect(re.search(r"Type:\s+DYN", header) and re.search(r"FLAGS_1.*\bPIE\b", dynamic),
           "not position-independent (PIE)")
    expect("GNU_RELRO" in segments, "no RELRO")
    expect(re.search(r"FLAGS.*\bBIND_NOW\b|\(BIND_NOW\)|FLAGS_1.*\bNOW\b", dynamic),
           "not bound before main (RELRO is not full)")
    stack = re.search(r"GNU_STACK\s.*?\s(R\w*E?)\s+0x", segments)
    expect(stack and "E" not in stack.group(1), "the stack can be executed")
    expect(not re.search(r"LOAD\s.*\sRWE\s", segments), "a segment is writable and executable")
    expect("TEXTREL" not in dynamic, "relocations in the code")
    expect("RPATH" not in dynamic and "RUNPATH" not in dynamic, "a search path of its own")
    expect("__stack_chk_fail" in imports or "__stack_chk_fail_local" in imports,
           "no stack protector")
    expect(any(re.match(r"__\w+_chk$", one) and "stack" not in one for one in imports),
           "no fortified call")
    with open(name, "rb") as file:
        expect(b"terminate called" not in file.read(), "the C++ library has a word to say on standard error")
    if narrow:
        # In the objects of ours: what the C++ runtime does in the executable is its own business.
        place = os.path.dirname(name)
        objects = glob.glob(f"{place}/*.a") + glob.glob(f"{place}/CMakeFiles/velmora.dir/**/*.o", recursive=True)
        expect(objects, "there is no library of ours beside it")
        for line in output("nm", "-A", "-u", *objects).splitlines():
            place, symbol = line.split(" U ") if " U " in line else ("", "")
            if symbol.strip() in NARROW:
                member = place.split(":")[1] if place.count(":") > 1 else os.path.basename(place)
                problems.add(name, 1, f"{member}: {symbol}: the form without large files and late times")
    expect([one for one in needed if not one.startswith("ld-linux")] == ["libc.so.6"],
           "it needs the C library alone, not: " + ", ".join(needed))
    loaded = [line.split()[0] for line in output("ldd", name).splitlines()]
    others = [one for one in loaded
              if not re.search(r"^linux-(vdso|gate)\.so|^libc\.so\.6$|/ld-linux[\w-]*\.so\.\d$", one)]
    expect(not others, "it loads more than the C library: " + ", ".join(others))


executables = sys.argv[1:] or ["build/native/velmora", "build/i686/velmora"]
for executable in executables:
    look(executable)
problems.end()
