"""A sample of every sweep: each start is disturbed at some of its calls, evenly spread."""

import pytest

import crowds
import memory
import sweeps
from named import judge
from scenarios import SCENARIOS

ERRORS = 40  # disturbed starts of each scenario
LASTING = 20
KILLS = 25
NO_MEMORY = 80


def spread(jobs, number):
    """So many of them, the first and the last included."""
    if len(jobs) <= number:
        return jobs
    return [jobs[at * (len(jobs) - 1) // (number - 1)] for at in range(number)]


def failures(kind, cases):
    """The cases that are neither as promised nor brought about by what is required."""
    for case in cases:
        judge(kind, case)
    return [case for case in cases if case["verdict"] == "failed"]


@pytest.mark.parametrize("name", SCENARIOS)
def test_calls_that_fail(in_a_world, name):
    calls = in_a_world(sweeps.list_calls, name)
    cases = in_a_world(sweeps.disturb, name, spread(sweeps.failures(calls), ERRORS))
    assert len(cases) == ERRORS
    assert failures("errors", cases) == []


@pytest.mark.parametrize("name", sweeps.LASTING)
def test_calls_that_go_on_failing(in_a_world, name):
    calls = in_a_world(sweeps.list_calls, name)
    cases = in_a_world(sweeps.disturb, name, spread(sweeps.lasting_failures(calls), LASTING), True)
    assert len(cases) == LASTING
    assert failures("lasting", cases) == []


@pytest.mark.parametrize("name", SCENARIOS)
def test_kills(in_a_world, name):
    calls = in_a_world(sweeps.list_calls, name)
    cases = in_a_world(sweeps.disturb, name, spread([(call, "KILL") for call in calls if not call.of_child], KILLS))
    assert len(cases) == KILLS
    assert failures("kills", cases) == []


@pytest.mark.usefixtures("takes_a_library")
def test_allocations_that_fail(in_a_world):
    numbers = spread(list(range(1, in_a_world(memory.count) + 1)), NO_MEMORY)
    cases = in_a_world(memory.fail, numbers)
    assert len(cases) == NO_MEMORY
    assert failures("memory", cases) == []
    assert {case["row"] for case in cases} >= {"QVMRL0004E"}


@pytest.mark.parametrize("again", [False, True], ids=["first", "second"])
@pytest.mark.parametrize("size", [2, 8, 32])
def test_crowds(in_a_world, size, again):
    cases = in_a_world(crowds.rounds, size, again, 2)
    assert len(cases) == 2
    assert failures("crowds", cases) == []


def test_a_restart_storm(in_a_world):
    """Eight restarts while the old platform takes its time."""
    cases = in_a_world(crowds.storm, 8, True, 1)
    assert len(cases) == 1
    assert failures("storms", cases) == []
