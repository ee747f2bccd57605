"""A sample of the sweeps, for every check; `run` does all of them.

    VELMORA   the executable, build/native/velmora unless given
"""

import os
import pathlib
import sys

import pytest

sys.dont_write_bytecode = True
HERE = pathlib.Path(__file__).resolve().parent
sys.path[:0] = [str(HERE.parent / "launch"), str(HERE)]

import namespaces  # noqa: E402
from pieces import ROOT, pieces, sanitized  # noqa: E402

ANNA = 1000


@pytest.fixture(scope="session")
def built():
    launcher = ROOT / os.environ.get("VELMORA", "build/native/velmora")
    assert launcher.is_file(), "no launcher at %s; build it, or name it in VELMORA" % launcher
    return pieces(launcher)


@pytest.fixture
def takes_a_library(built):
    """For a test that preloads one."""
    if sanitized(built):
        pytest.skip("the address sanitizer lets no library come before its own")


@pytest.fixture(scope="session")
def in_a_world(built):
    """Calls a function of (pieces, ...) in a world of its own."""
    return lambda function, *arguments: namespaces.isolated(lambda: function(built, *arguments), ANNA, 300)
