"""Real-platform tests: velmora starts an OSGi platform on a JVM, from the example installation of ./demo.

    VELMORA   the executable, build/native/velmora unless given

A test that asks for `example` runs in a process and in namespaces of its own, where /mnt and /tmp are private: the
installation is /mnt/app, the home directory /mnt/home, the user anna without privileges, whoever runs the tests.
"""

import io
import linecache
import os
import pathlib
import subprocess
import sys
import tarfile
import tempfile

import pytest

sys.dont_write_bytecode = True
HERE = pathlib.Path(__file__).resolve().parent
ROOT = HERE.parent.parent
sys.path.insert(0, str(HERE.parent / "launch"))

import namespaces  # noqa: E402
import example as examples  # noqa: E402

ANNA = 1000
LONGEST_TEST = 60


@pytest.fixture(scope="session")
def packed():
    """What an installation is made from, as one archive: a world may hide the place where it lies."""
    missing = subprocess.run(["sh", "-c", ". tools/packages.sh && missing_packages platform"], cwd=ROOT, check=True,
                             stdout=subprocess.PIPE, text=True).stdout.split()
    if missing:
        pytest.skip("packages are missing: " + " ".join(missing))
    launcher = ROOT / os.environ.get("VELMORA", "build/native/velmora")
    assert launcher.is_file(), "no launcher at %s; build it, or name it in VELMORA" % launcher
    with tempfile.TemporaryDirectory() as folder:
        pieces = os.path.join(folder, "pieces")
        subprocess.run(["bash", "-c", '. "$1/example/installation.sh" && example_build "$2" "$3"', "bash", str(ROOT),
                        pieces, str(launcher)], check=True)
        archive = io.BytesIO()
        with tarfile.open(fileobj=archive, mode="w") as tar:
            tar.add(ROOT / "example", "example")
            tar.add(pieces, "pieces")
            tar.add(launcher, "velmora")
        return archive.getvalue()


@pytest.fixture
def example(packed):
    """A fresh installation and an empty home directory."""
    return examples.Example(packed, ANNA)


@pytest.hookimpl(tryfirst=True)
def pytest_pyfunc_call(pyfuncitem):
    example = pyfuncitem.funcargs.get("example")
    if example is None:
        return None
    for path in [*HERE.glob("*.py"), *(HERE.parent / "launch").glob("*.py")]:
        # A failure is shown with its lines, even when the world hides the place where the tests lie.
        text = path.read_text()
        linecache.cache[str(path)] = (len(text), None, text.splitlines(True), str(path))

    def in_the_world():
        try:
            example.enter()
            pyfuncitem.obj(example)
            return "passed"
        except BaseException:
            return str(pyfuncitem.repr_failure(pytest.ExceptionInfo.from_current()))

    try:
        outcome = namespaces.isolated(in_the_world, ANNA, LONGEST_TEST)
    except (namespaces.Hanging, RuntimeError) as trouble:
        outcome = str(trouble)
    if outcome != "passed":
        pytest.fail(outcome, pytrace=False)
    return True
