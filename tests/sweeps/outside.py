"""What a start may write: the user's area, and fixed names in /tmp. Everything else stays as it was."""

import os
import re
import stat

from lab import EXIT_DATA, SAVED
from world import HOME

AREA = HOME + "/VANTOR"
FIXED = re.compile(r"/tmp/(velmora(_\d{8}_\d{6}_\d{3})?\.log|tzn_shutdown|vantor\.rcp\.anna\.(abc|old)\.libx\.so)")


def may_be_written(path):
    return path == AREA or path.startswith(AREA + "/") or FIXED.fullmatch(path) is not None or path == EXIT_DATA


def _look(path):
    """What changes when somebody writes there; of a directory, whose entries are looked at themselves, the mode."""
    entry = os.lstat(path)
    if stat.S_ISDIR(entry.st_mode):
        return entry.st_mode
    return entry.st_mode, entry.st_ino, entry.st_size, entry.st_mtime_ns, entry.st_nlink


def around():
    """Everything below /mnt and /tmp that is not for writing."""
    found = {}
    for top in ("/mnt", "/tmp"):
        for folder, folders, names in os.walk(top):
            folders[:] = [name for name in folders if os.path.join(folder, name) not in (AREA, SAVED)]
            for path in (os.path.join(folder, name) for name in folders + names):
                if not may_be_written(path):
                    found[path] = _look(path)
    return found


def changes(before):
    """What is not as it was, as problems."""
    after = around()
    return sorted("outside:" + path for path in before.keys() | after.keys() if before.get(path) != after.get(path))


# ---- the same for the whole system, from what strace shows of a start and its helpers

CALL = re.compile(r"(\d+) +(\w+)\((.*)\) += (-?\d+|\?)")
CHANGING = re.compile(r"creat|(mkdir|rename|unlink|rmdir|link|symlink|mknod|chmod|chown|lchown|truncate|setxattr|utime).*"
                      r"|(fchmodat|fchownat|futimesat).*")
TRACED = ["-f", "-y", "-s", "4096", "-e", "signal=none", "-e", "trace=%file,fchmod,fchown,ftruncate"]


def _paths(arguments):
    """Those that are named, in whole; a relative one stands behind the directory that it is relative to."""
    return [os.path.join(folder, path) for folder, path in re.findall(r'(?:<([^>]*)>, )?"((?:[^"\\]|\\.)*)"', arguments)]


def _whole(trace):
    """The lines of the trace; where another process came in between, the two halves of a call are one line again."""
    halves = {}
    for line in trace.splitlines():
        number = line.partition(" ")[0]
        if line.endswith(" <unfinished ...>"):
            halves[number] = line.removesuffix(" <unfinished ...>")
            continue
        resumed = re.match(r"\d+ +<\.\.\. \w+ resumed>", line)
        yield halves.pop(number) + line[resumed.end():] if resumed else line


def writes(trace, platform):
    """The paths that the launcher and its helpers wrote to, or tried to; what the platform does is its own matter."""
    found, left = set(), set()
    for line in _whole(trace):
        call = CALL.match(line)
        if call is None or call.group(1) in left:
            continue
        number, name, arguments, result = call.groups()
        paths = _paths(arguments)
        if name == "execve" and result == "0" and paths[0] == platform:
            left.add(number)
        elif name in ("open", "openat"):
            if re.search(r"O_WRONLY|O_RDWR|O_CREAT|O_TRUNC", arguments):
                found.add(paths[0])
        elif name in ("fchmod", "fchown", "ftruncate"):
            found.add(re.match(r"\d+<([^>]*)>", arguments).group(1))
        elif CHANGING.fullmatch(name) and "EEXIST" not in line:
            # The first path of a symbolic link is only a text.
            found.update(paths[1:] if name.startswith("symlink") else paths)
    return found
