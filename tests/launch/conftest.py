"""Launch tests: a test that asks for `world` runs in a process and in namespaces of its own.

    VELMORA        the executable, build/native/velmora unless given
    VELMORA_SHARD  "1/2" or "2/2": run only that share of the tests
    VELMORA_GCOV   a directory that everybody may write, for the counters of an instrumented launcher
"""

import linecache
import os
import pathlib
import subprocess
import sys
import tempfile

import pytest

sys.dont_write_bytecode = True

import namespaces  # noqa: E402
import world as worlds  # noqa: E402

HERE = pathlib.Path(__file__).resolve().parent
BUILT = {}


def pytest_configure(config):
    """What every world needs is read into memory, since a world may hide the place where it lies."""
    root = HERE.parent.parent
    executable = root / os.environ.get("VELMORA", "build/native/velmora")
    if not executable.is_file():
        raise pytest.UsageError("no launcher at %s; build it, or name it in VELMORA" % executable)
    BUILT["launcher"] = executable.read_bytes()
    with tempfile.TemporaryDirectory() as folder:
        made = os.path.join(folder, "stand-in")
        compile_it = [os.environ.get("CC", "cc"), "-O1", str(HERE / "stand_in.c"), "-o", made]
        if subprocess.run(compile_it + ["-static"], stderr=subprocess.DEVNULL).returncode != 0:
            subprocess.run(compile_it, check=True)
        BUILT["stand_in"] = pathlib.Path(made).read_bytes()


def pytest_collection_modifyitems(items):
    share, _, all_shares = os.environ.get("VELMORA_SHARD", "1/1").partition("/")
    items[:] = [item for number, item in enumerate(items) if number % int(all_shares) == int(share) - 1]


def pytest_runtest_setup(item):
    for marker in item.iter_markers("needs_root"):
        if not namespaces.is_root():
            pytest.skip("needs root: " + marker.args[0])


@pytest.fixture
def world(request):
    """Empty; the test installs what it needs."""
    marker = request.node.get_closest_marker("world")
    return worlds.World(BUILT["launcher"], BUILT["stand_in"], **(marker.kwargs if marker else {}))


@pytest.hookimpl(tryfirst=True)
def pytest_pyfunc_call(pyfuncitem):
    world = pyfuncitem.funcargs.get("world")
    if not isinstance(world, worlds.World):
        return None
    given = {name: pyfuncitem.funcargs[name] for name in pyfuncitem._fixtureinfo.argnames}
    for path in HERE.glob("*.py"):
        # A failure is shown with its lines, even when the world hides the place where the tests lie.
        text = path.read_text()
        linecache.cache[str(path)] = (len(text), None, text.splitlines(True), str(path))

    def in_the_world():
        try:
            world.enter()
            pyfuncitem.obj(**given)
            return "passed", ""
        except pytest.skip.Exception as skipped:
            return "skipped", str(skipped)
        except BaseException:
            return "failed", str(pyfuncitem.repr_failure(pytest.ExceptionInfo.from_current()))
        finally:
            sys.stdout.flush()
            sys.stderr.flush()

    marker = pyfuncitem.get_closest_marker("within")
    try:
        outcome, text = namespaces.isolated(in_the_world, world.uid, marker.args[0] if marker else 120,
                                            os.environ.get("VELMORA_GCOV"))
    except (namespaces.Hanging, RuntimeError) as trouble:
        pytest.fail(str(trouble), pytrace=False)
    if outcome == "skipped":
        pytest.skip(text)
    if outcome == "failed":
        pytest.fail(text, pytrace=False)
    return True
