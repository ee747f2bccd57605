"""The tree as the lints see it: its files, and its C++ text in pieces.

Every lint runs at the top of the tree, prints one line "file:line: problem" for each problem, and
ends with status 1 when there was one.
"""
import bisect
import os
import re
import subprocess
import sys

# From the ground up: a file includes its own folder and those before it.
FLOORS = [
    "diag",
    "platform/linux",
    "launcher/properties",
    "launcher/user_area",
    "launcher/command",
    "launcher",
]


def files():
    """Every file of the project: what git knows or would take, or all there is without git."""
    listed = subprocess.run(
        ["git", "ls-files", "-z", "--cached", "--others", "--exclude-standard"],
        capture_output=True, check=False)
    if listed.returncode == 0:
        names = listed.stdout.decode("utf-8", "surrogateescape").split("\0")
    else:
        names = [os.path.relpath(os.path.join(folder, name), ".")
                 for folder, _, found in os.walk(".") for name in found]
    return sorted(name for name in set(names)
                  if name and os.path.isfile(name) and not name.startswith(("build/", ".git/")))


def sources():
    """The launcher's own C++ files."""
    return [name for name in files()
            if name.endswith((".cpp", ".h")) and os.path.dirname(name) in FLOORS]


def read(name):
    with open(name, encoding="utf-8", errors="replace") as file:
        return file.read()


class Problems:
    """Collects, prints, and gives the exit status."""

    def __init__(self):
        self.lines = []

    def add(self, name, line, text):
        self.lines.append((name, line, text))

    def end(self):
        for name, line, text in sorted(self.lines):
            print(f"{name}:{line}: {text}")
        sys.exit(1 if self.lines else 0)


TOKEN = re.compile(
    r"""(?P<comment>//(?:\\\n|[^\n])*|/\*.*?\*/)
      |(?P<raw>\b(?:u8|u|U|L)?R"(?P<mark>[^\s()\\]*)\(.*?\)(?P=mark)")
      |(?P<string>(?:\b(?:u8|u|U|L))?"(?:\\.|[^"\\\n])*")
      |(?P<number>\b\d[\w.]*(?:'\w+)*)
      |(?P<char>(?:\b(?:u8|u|U|L))?'(?:\\.|[^'\\\n])+')""",
    re.VERBOSE | re.DOTALL)


class Cpp:
    """One C++ file. `code` is its text with comments and the insides of literals blanked out, every
    character still at its place."""

    def __init__(self, name):
        self.name = name
        self.text = read(name)
        self.comments = []  # (offset, text)
        self.strings = []   # (offset, end, text between the quotes)
        self.ends = [m.start() for m in re.finditer("\n", self.text)]
        pieces = []
        last = 0
        for token in TOKEN.finditer(self.text):
            kind = token.lastgroup
            if kind == "number":
                continue
            pieces.append(self.text[last:token.start()])
            last = token.end()
            whole = token.group()
            blank = re.sub(r"[^\n]", " ", whole)
            if kind == "comment":
                self.comments.append((token.start(), whole))
            elif kind == "char":
                blank = "'" + blank[1:-1] + "'"
            else:
                first = whole.index('"')
                inside = whole[first + 1:-1]
                before = self.text[:token.start()].rpartition("\n")[2]
                if re.match(r"\s*#\s*include\s*$", before):
                    blank = whole
                else:
                    blank = blank[:first] + '"' + blank[first + 1:-1] + '"'
                    self.strings.append((token.start(), token.end(), inside))
            pieces.append(blank)
        pieces.append(self.text[last:])
        self.code = "".join(pieces)

    def line(self, offset):
        return bisect.bisect_left(self.ends, offset) + 1

    def includes(self):
        """(line, path, quoted or angled) of every include."""
        for found in re.finditer(r'^[ \t]*#[ \t]*include[ \t]*(["<])([^">]*)[">]', self.code, re.M):
            yield self.line(found.start()), found.group(2), found.group(1) == '"'

    def literals(self):
        """(line, text) of every string, neighbours joined as the compiler does."""
        joined = []
        for start, end, inside in self.strings:
            if joined and not self.code[joined[-1][1]:start].strip():
                joined[-1] = (joined[-1][0], end, joined[-1][2] + inside)
            else:
                joined.append((start, end, inside))
        for start, _, inside in joined:
            yield self.line(start), inside

    def functions(self):
        """(name, first line, last line) of every function that has a body, signature included.
        A body is what follows a closing parenthesis outside of any other body."""
        stack = []
        since = 0  # where the text before a brace begins: after the last ; { or }
        code = re.sub(r"^[ \t]*#(?:\\\n|[^\n])*", lambda m: re.sub(r"[^\n]", " ", m.group()),
                      self.code, flags=re.M)
        for found in re.finditer(r"[;{}]", code):
            head = code[since:found.start()]
            if found.group() == "{":
                inside = any(kind == "function" for kind, _, _ in stack)
                named = re.search(r"([~\w]+)\s*\(", head)
                body = re.search(r"\)\s*(?:const|noexcept|override|\s)*(?::(?!:).*)?$", head, re.S)
                if not inside and named and body:
                    start = since + len(head) - len(head.lstrip())
                    stack.append(("function", named.group(1), start))
                else:
                    stack.append(("other", "", 0))
            elif found.group() == "}" and stack:
                kind, name, start = stack.pop()
                if kind == "function":
                    yield name, self.line(start), self.line(found.start())
            since = found.end()
