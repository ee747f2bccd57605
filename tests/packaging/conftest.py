"""Packaging tests: the catalogue, the manual, the documents' command lines, the desktop's entries.

    VELMORA   the executable, build/native/velmora unless given

A test that starts velmora does it in a process and in namespaces of its own, where /mnt and /tmp are private: the rcp home
is /mnt/app, the user is anna, number 1000.
"""

import os
import pathlib
import shutil
import subprocess
import sys

import pytest

ROOT = pathlib.Path(__file__).resolve().parents[2]
sys.dont_write_bytecode = True
sys.path.insert(0, str(ROOT / "tests" / "launch"))

import namespaces  # noqa: E402

APP = "/mnt/app"
BASE = APP + "/rcp/eclipse/plugins/base"
# Notes its words, one per line, for each start in a file of its own.
PLATFORM = """#!/bin/sh
exec 9>/mnt/starts.lock
flock 9
number=$(ls /mnt/starts | wc -l)
printf '%s\\n' "$@" >"/mnt/starts/$number"
"""


def needs(program, package):
    """Skips without the program; ./check installs its package."""
    if shutil.which(program) is None:
        pytest.skip("%s is missing: package %s" % (program, package))
    return program


class Installation:
    """What velmora's own files are, read into memory; laid out in a world by `enter`."""

    def __init__(self):
        launcher = ROOT / os.environ.get("VELMORA", "build/native/velmora")
        assert launcher.is_file(), "no launcher at %s; build it, or name it in VELMORA" % launcher
        packaging = ROOT / "packaging"
        self._files = {
            APP + "/rcp/velmora": (launcher.read_bytes(), 0o755),
            APP + "/rcp/velmora.properties": ((packaging / "home" / "velmora.properties").read_bytes(), 0o644),
            APP + "/open-link": ((packaging / "desktop" / "open-link").read_bytes(), 0o755),
            BASE + "/config.ini": (b"osgi.bundles=\n", 0o644),
            BASE + "/rcpinstall.properties": (b"application=demo\n", 0o644),
            BASE + "/platform.xml": (b"<config/>\n", 0o644),
            BASE + "/launcher.jar": (b"", 0o644),
            BASE + "/linux/x86/eclipse": (PLATFORM.encode(), 0o755),
        }
        for page in sorted((packaging / "man").glob("*.[157]")):
            self._files["/mnt/man/man%s/%s" % (page.suffix[1:], page.name)] = (page.read_bytes(), 0o644)

    def enter(self):
        for name, (data, mode) in self._files.items():
            path = pathlib.Path(name)
            path.parent.mkdir(parents=True, exist_ok=True)
            path.write_bytes(data)
            path.chmod(mode)
        for folder in ("/mnt/bin", "/mnt/home", "/mnt/starts"):
            os.mkdir(folder)
        os.symlink("../app/rcp/velmora", "/mnt/bin/velmora")

    @staticmethod
    def run(words, cwd="/mnt/home"):
        """(status, output, error output) of a command of anna's."""
        env = {"HOME": "/mnt/home", "USER": "anna", "LC_ALL": "C.UTF-8", "MANPATH": "/mnt/man", "MANWIDTH": "100",
               "PATH": "/mnt/bin:/usr/bin:/bin"}
        for name in ("ASAN_OPTIONS", "LSAN_OPTIONS", "UBSAN_OPTIONS"):
            if name in os.environ:
                env[name] = os.environ[name]
        done = subprocess.run(words, cwd=cwd, env=env, stdin=subprocess.DEVNULL, stdout=subprocess.PIPE,
                              stderr=subprocess.PIPE, text=True, timeout=30)
        return done.returncode, done.stdout, done.stderr

    @staticmethod
    def starts():
        """The words of every start of the platform, in order."""
        return [pathlib.Path("/mnt/starts", name).read_text().splitlines() for name in sorted(os.listdir("/mnt/starts"), key=int)]

    def isolated(self, story):
        """Calls story(self) in a world with the installation, and returns what it returns."""
        def told():
            self.enter()
            return story(self)
        return namespaces.isolated(told, 1000, 60)


@pytest.fixture(scope="session")
def installation():
    return Installation()
