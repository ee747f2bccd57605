"""Hostile worlds are worlds of the launch tests, whose README is the manual."""

import importlib.util
import pathlib
import sys

sys.dont_write_bytecode = True
LAUNCH = pathlib.Path(__file__).resolve().parent.parent / "launch"
sys.path.insert(0, str(LAUNCH))

_described = importlib.util.spec_from_file_location("launch_conftest", LAUNCH / "conftest.py")
_launch = importlib.util.module_from_spec(_described)
_described.loader.exec_module(_launch)

pytest_configure = _launch.pytest_configure
pytest_collection_modifyitems = _launch.pytest_collection_modifyitems
pytest_runtest_setup = _launch.pytest_runtest_setup
pytest_pyfunc_call = _launch.pytest_pyfunc_call
world = _launch.world
