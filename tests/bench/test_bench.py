"""bench/startup measures what it says, bench/report believes nothing else, and the counts stay what the page shows.

Takes build/native/velmora and build/i686/velmora; no time is looked at.
"""

import json
import pathlib
import subprocess
import sys
from importlib.machinery import SourceFileLoader
from importlib.util import module_from_spec, spec_from_loader

import pytest

ROOT = pathlib.Path(__file__).resolve().parents[2]
BENCH = ROOT / "bench"
LAUNCHERS = {build: ROOT / "build" / build / "velmora" for build in ("native", "i686")}
SCENARIOS = ["first", "warm", "daily", "beside", "fatal"]
VELMORA = [build + "-" + scenario for build in LAUNCHERS for scenario in SCENARIOS]
STATIC = ["static-%s-%s" % (build, scenario) for build in LAUNCHERS for scenario in ("first", "warm")]
OTHERS = ["limit", "limit-ps", "floor-native", "floor-i686", "least-native-first", "least-i686-first",
          "least-native-warm", "least-i686-warm", "least-native-beside", "least-i686-beside",
          "plain-native-warm", "plain-i686-warm", "dash", "jpackage"]

sys.dont_write_bytecode = True
sys.path[:0] = [str(BENCH), str(ROOT / "tests" / "sweeps")]

import startup_page  # noqa: E402


def startup(folder, *words, **launchers):
    """(status, error output, results or None) of two rounds."""
    output = folder / "startup.json"
    named = {**LAUNCHERS, **launchers}
    done = subprocess.run([BENCH / "startup", "--rounds", "2", "--native", named["native"], "--i686", named["i686"],
                           "--output", output, *words], stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True,
                          timeout=300, check=False)
    return done.returncode, done.stderr, json.loads(output.read_text()) if output.exists() else None


@pytest.fixture(scope="module")
def folder(tmp_path_factory):
    return tmp_path_factory.mktemp("results")


@pytest.fixture(scope="module")
def result(folder):
    status, said, found = startup(folder)
    assert (status, said) == (0, "")
    return found


@pytest.fixture(scope="module")
def report():
    loader = SourceFileLoader("report", str(BENCH / "report"))
    module = module_from_spec(spec_from_loader("report", loader))
    loader.exec_module(module)
    return module


def test_everything_is_started_in_every_round(result):
    assert sorted(result["starts"]) == sorted(VELMORA + STATIC + OTHERS)
    assert sorted(result["disk"]) == ["disk-disk", "disk-flushed", "disk-memory"]
    for name, start in {**result["starts"], **result["disk"]}.items():
        for key in ("to_child", "to_exit", "cpu", "resident", "faults"):
            assert len(start[key]) == 2, (name, key)
        arrives = not name.endswith("-fatal")
        assert all((value is not None and value > 0) == arrives for value in start["to_child"]), name
        assert all(value > 0 for value in start["to_exit"] + start["resident"]), name


def test_everything_is_counted(result):
    assert sorted(result["counts"]) == sorted(result["starts"])
    for name, count in result["counts"].items():
        assert count["calls_with_helpers"] >= count["calls"] > 0, name
        assert count["instructions_with_helpers"] >= count["instructions"] > 0, name


def test_helpers_and_libraries_are_known(result):
    """The shell, ps and grep beside a running platform; each launcher loads the C library, what is static nothing."""
    for name in VELMORA:
        assert result["counts"][name]["helpers"] == (3 if name.endswith("-beside") else 0), name
        assert [path.rpartition("/")[2] for path in result["counts"][name]["libraries"]] == ["libc.so.6"], name
    for name in ["limit", *STATIC]:
        assert result["counts"][name]["libraries"] == [], name
    assert [result["counts"][name]["helpers"] for name in ("limit", "limit-ps")] == [0, 3]


def test_what_the_tables_need_is_kept(result):
    text = startup_page.tables(result)
    for name in result["starts"]:
        assert startup_page.label(result, name) in text
    assert startup_page.chart(result).count("<rect") == 1 + len(VELMORA) - 2 + len(STATIC + OTHERS)


def test_a_target_is_judged_by_its_figures(result):
    """Just reached, and just missed."""
    result = json.loads(json.dumps(result))
    for build, calls in (("native", 120), ("i686", 121)):
        result["counts"][build + "-warm"]["calls"] = calls
    found = {what: [(value, reached) for value, _, reached in figures]
             for what, _, figures, _ in startup_page.target_rows(result)}
    assert found["a warm start's system calls"] == [(120, True), (121, False)]


def test_a_start_that_fails_is_no_measurement(tmp_path):
    status, said, found = startup(tmp_path, "--no-counts", "--only", "first", native="/bin/true")
    assert (status, found) == (1, None)
    assert said.startswith("error: ") and "native-first" in said


def test_the_page_says_what_was_not_measured(report, tmp_path):
    text, charts, missing = report.page(tmp_path)
    assert missing == ["run bench/startup", "run bench/growth", "run bench/micro"]
    assert charts == {} and "Not measured on these sources; `bench/startup` does it." in text


def test_the_page_shows_what_was_measured(report, result, folder):
    text, charts, missing = report.page(folder)
    assert missing == ["run bench/growth", "run bench/micro"]
    assert list(charts) == ["performance-startup.svg"]
    assert startup_page.counts_table(result) in text


def test_figures_of_other_sources_are_not_shown(report, result, tmp_path):
    (tmp_path / "startup.json").write_text(json.dumps({**result, "sources": "000000000000"}))
    assert "run bench/startup" in report.page(tmp_path)[2]


@pytest.mark.parametrize("field", ["counts", "disk", "load", "machine"])
def test_a_field_that_is_missing_ends_the_report(report, result, tmp_path, field):
    (tmp_path / "startup.json").write_text(json.dumps({key: result[key] for key in result if key != field}))
    with pytest.raises(KeyError, match=field):
        report.page(tmp_path)
