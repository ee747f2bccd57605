"""Runs a function in a process of its own, in namespaces of its own.

There /tmp, /mnt and /dev/shm are empty and private, and process numbers begin anew. Whatever the function starts,
mounts or writes there is gone when it returns. Root gets the namespaces as they come, an ordinary user inside a user
namespace in which he has the number that the caller names. Knows nothing of launchers and platforms.
"""

import ctypes
import os
import pickle
import select
import signal
import time
import traceback

NEWNS, NEWUSER, NEWPID = 0x00020000, 0x10000000, 0x20000000
MS_NOSUID, MS_NODEV, MS_REC, MS_PRIVATE = 0x2, 0x4, 0x4000, 0x40000
PR_SET_PDEATHSIG, PR_SET_DUMPABLE = 1, 4

_libc = ctypes.CDLL(None, use_errno=True)


class Hanging(Exception):
    """The function did not return in time, or its process ended without an answer."""


def _check(result, what):
    if result != 0:
        error = ctypes.get_errno()
        raise OSError(error, "%s: %s" % (what, os.strerror(error)))


def mount(kind, target, options="", source=None, flags=0):
    """mount(2); the caller needs the namespace's privileges."""
    _check(_libc.mount((source or kind).encode(), target.encode(), kind.encode() or None, ctypes.c_ulong(flags),
                       options.encode() or None), "mount " + target)


def is_root():
    return os.getuid() == 0


def isolated(function, uid, seconds, bind=None):
    """Returns what the function returns (it must be picklable), called in a world of the user `uid`.

    `bind` is a directory of the outer world that appears at /dev/shm/outer.
    """
    reader, writer = os.pipe()
    keeper = os.fork()
    if keeper == 0:
        status = 1
        try:
            os.close(reader)
            _keep(function, uid, bind, writer)
            status = 0
        except BaseException:
            _send(writer, ("trouble", traceback.format_exc()))
        finally:
            os._exit(status)
    os.close(writer)
    first, answers, deadline = None, [], time.monotonic() + seconds
    data = b""
    with os.fdopen(reader, "rb", buffering=0) as stream:
        while True:
            ready = select.select([stream], [], [], max(0.0, deadline - time.monotonic()))[0]
            piece = stream.read(1 << 20) if ready else b""
            if not piece:
                break
            data += piece
    hanging = not ready
    while data:
        size = int.from_bytes(data[:8], "little")
        answers.append(pickle.loads(data[8:8 + size]))
        data = data[8 + size:]
    for kind, value in answers:
        if kind == "first":
            first = value
    if hanging:
        os.kill(first or keeper, signal.SIGKILL)
    os.waitpid(keeper, 0)
    for kind, value in answers:
        if kind == "answer":
            return value
        if kind == "trouble":
            raise RuntimeError("no world could be made:\n" + value)
    raise Hanging("not done after %s seconds" % seconds if hanging else "the test's process was killed")


def _send(writer, value):
    data = pickle.dumps(value)
    data = len(data).to_bytes(8, "little") + data
    while data:
        data = data[os.write(writer, data):]


def _keep(function, uid, bind, writer):
    """Makes the namespaces, and waits for their first process."""
    _libc.prctl(PR_SET_PDEATHSIG, signal.SIGKILL)
    if is_root():
        _check(_libc.unshare(NEWNS | NEWPID), "unshare")
    else:
        mine = (os.getuid(), os.getgid())
        _check(_libc.unshare(NEWUSER | NEWNS | NEWPID), "unshare (user namespaces must be allowed)")
        for name, text in (("setgroups", "deny"), ("uid_map", "%d %d 1" % (uid, mine[0])),
                           ("gid_map", "%d %d 1" % (uid, mine[1]))):
            with open("/proc/self/" + name, "w") as file:
                file.write(text)
    mount("", "/", source="none", flags=MS_REC | MS_PRIVATE)
    told, tell = os.pipe()
    first = os.fork()
    if first == 0:
        try:
            os.close(tell)
            os.read(told, 1)  # until the keeper has sent its number, so that the answers do not mix
            _libc.prctl(PR_SET_PDEATHSIG, signal.SIGKILL)
            _first_process(function, uid, bind, writer)
        except BaseException:
            _send(writer, ("trouble", traceback.format_exc()))
        finally:
            os._exit(0)
    _send(writer, ("first", first))
    os.close(writer)
    os.close(tell)
    os.waitpid(first, 0)


def _first_process(function, uid, bind, writer):
    """Reaps every orphan, so that a process that has ended is gone; with it ends the whole world."""
    outer = os.open(bind, os.O_PATH) if bind else None
    mount("proc", "/proc", flags=MS_NOSUID | MS_NODEV)
    mount("tmpfs", "/tmp", "mode=1777")
    mount("tmpfs", "/mnt", "mode=0755,uid=%d,gid=%d" % (uid, uid))
    mount("tmpfs", "/dev/shm", "mode=1777")
    if outer is not None:
        os.mkdir("/dev/shm/outer")
        mount("", "/dev/shm/outer", source="/proc/self/fd/%d" % outer, flags=0x1000)
    child = os.fork()
    if child == 0:
        try:
            os.umask(0o022)
            if is_root() and uid != 0:
                # The real user stays root, so that a test can ask for privileges back.
                os.setgroups([])
                os.setegid(uid)
                os.seteuid(uid)
                _libc.prctl(PR_SET_DUMPABLE, 1)
            _send(writer, ("answer", function()))
        except BaseException:
            _send(writer, ("trouble", traceback.format_exc()))
        finally:
            os._exit(0)
    os.close(writer)
    while os.waitpid(-1, 0)[0] != child:
        pass
