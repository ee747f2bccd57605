"""bench/growth and bench/micro: exponents are what they are called, targets are judged by their figures, and a start that
did not work is no measurement."""

import pathlib
import subprocess
import sys
from importlib.machinery import SourceFileLoader
from importlib.util import module_from_spec, spec_from_loader

import pytest

ROOT = pathlib.Path(__file__).resolve().parents[2]
BENCH = ROOT / "bench"

sys.dont_write_bytecode = True
sys.path[:0] = [str(BENCH), str(ROOT / "tests" / "launch"), str(ROOT / "tests" / "sweeps")]

import growth_page  # noqa: E402
import growth_world  # noqa: E402
import micro_page  # noqa: E402

SIZES = [0, 10, 32, 100, 316, 1000, 3162, 10000, 31623, 100000]


@pytest.fixture(scope="module")
def growth():
    loader = SourceFileLoader("growth", str(BENCH / "growth"))
    module = module_from_spec(spec_from_loader("growth", loader))
    loader.exec_module(module)
    return module


@pytest.mark.parametrize("power", [0.5, 1, 1.1, 1.5, 2])
def test_the_exponent_is_that_of_the_growth(growth, power):
    exponent, last = growth.fitted({size: 0.001 + 1e-5 * size ** power for size in SIZES})
    assert (exponent, last) == (pytest.approx(power), pytest.approx(power))


def test_what_is_below_half_of_the_constant_does_not_count(growth):
    """A millisecond of noise in the small sizes changes nothing; a square in the largest one does."""
    times = {size: 0.01 + 1e-6 * size for size in SIZES}
    noisy = {**times, 10: 0.011, 1000: 0.012, 3162: 0.0149}
    assert growth.fitted(noisy)[0] == pytest.approx(1)
    worse = {**times, 100000: 0.01 + 1e-11 * 100000 ** 2 * 10}
    assert growth.fitted(worse)[0] > 1.1 and growth.fitted(worse)[1] == pytest.approx(2)


def test_without_enough_above_the_constant_there_is_no_exponent(growth):
    assert growth.fitted({size: 1 + 1e-6 * size for size in SIZES}) == (None, None)


def curve(exponent):
    return {"name": "words", "unit": "words", "width": "native", "constant": 0.001, "exponent": exponent,
            "last_decade": 1.0, "processor_exponent": 1.0, "points": [[10, 0.002], [1000, 0.02], [100000, 2.0]]}


def results(exponent, ratio):
    return {"curves": [curve(exponent)], "rounds": 3, "load": [0.5, 0.6], "targets": {"exponent": 1.1, "floor": 3.0},
            "floor": {"native": {"properties": 100000, "floor": 0.01, "start": 0.03, "ratio": ratio,
                                 "quartiles": [2.5, 3.5], "processor_ratio": 2.9}}}


@pytest.mark.parametrize("exponent, ratio, missed", [
    (1.1, 3.0, 0), (1.11, 3.0, 1), (1.1, 3.01, 1), (None, 3.0, 1), (1.2, 4.0, 2)])
def test_a_target_is_judged_by_its_figure(exponent, ratio, missed):
    data = results(exponent, ratio)
    assert growth_page.render(data).count("**not reached**") == missed
    assert growth_page.all_reached(data) == (missed == 0)


def test_the_chart_shows_every_curve_of_its_width():
    data = results(1.0, 2.0)
    data["curves"].append({**curve(1.0), "width": "i686"})
    assert growth_page.chart(data).count("<polyline") == 1


def test_starts_are_measured(growth):
    """One round of one curve, with the real launchers."""
    done = subprocess.run([BENCH / "growth", "--rounds", "1", "--only", "named"], stdout=subprocess.PIPE, text=True,
                          timeout=300, check=False)
    assert done.returncode in (0, 1)
    for width in ("native", "i686"):
        assert "| named VM arguments | %s | " % width in done.stdout


def test_a_start_that_did_not_work_is_no_measurement(growth, monkeypatch):
    """The platform has to get every single word."""
    monkeypatch.setattr(growth_world.VmArguments, "sizes", (0, 10))
    monkeypatch.setattr(growth_world.VmArguments, "vm_options", lambda case: ["-Xn0"] * case.size)
    pieces = {"native": growth.build("native")}
    with pytest.raises(RuntimeError, match="10.native: status 0, told .* instead of"):
        growth.namespaces.isolated(
            lambda: growth_world.measure(pieces, [growth_world.VmArguments], 1, growth.shuffled), 1000, 60)


def test_single_functions_are_shown_by_their_largest_size():
    data = {"load": [1.0, 2.0], "benchmarks": [
        {"name": "foldPath/4", "run_type": "iteration", "cpu_time": 200.0},
        {"name": "foldPath/1024", "run_type": "iteration", "cpu_time": 204800.0},
        {"name": "foldPath_BigO", "run_type": "aggregate", "cpu_coefficient": 1.0}]}
    assert "| folding a path | segments | 4 | 200 ns | 1,024 | 205 µs | 200 ns |" in micro_page.render(data)
