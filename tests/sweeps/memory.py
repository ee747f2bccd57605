"""No memory: the n-th allocation after the beginning of main fails, for every n of a first start."""

import os

from lab import Lab, hold_still
from scenarios import SCENARIOS, follow_up, judge_end, prepare
from world import read

LIBRARY = "/mnt/no_memory.so"
NOTE = "/dev/shm/note"


def _first_start(pieces):
    hold_still()
    lab = Lab(pieces)
    prepare(lab, SCENARIOS["first"])
    with open(LIBRARY, "wb") as file:
        file.write(pieces["no_memory"])
    return lab


def _run(lab, number):
    """(status, what it said, the note)"""
    lab.reset()
    if os.path.exists(NOTE):
        os.unlink(NOTE)
    env = {"LD_PRELOAD": LIBRARY, "NO_MEMORY_AT": str(number), "NO_MEMORY_NOTE": NOTE}
    status, said = lab.run(env=env)
    return status, said, read(NOTE) if os.path.exists(NOTE) else ""


def count(pieces):
    """In a world: how often a first start allocates."""
    status, said, note = _run(_first_start(pieces), 0)
    assert (status, said) == (0, "") and note.startswith("count "), (status, said, note)
    return int(note.split()[1])


def fail(pieces, numbers):
    """In a world: the cases of these allocations."""
    lab, cases = _first_start(pieces), []
    for number in numbers:
        status, said, note = _run(lab, number)
        case = {"number": number, "status": status, "row": "", "asked": "", "problems": []}
        cases.append(case)
        if not note.startswith("failed "):
            case["problems"] = ["not-reached"]
            continue
        file, symbol = note.split()[1:]
        # Symbols of the C library are those before the place, since its inner functions have no names.
        case["asked"] = "the launcher" if file.endswith("/velmora") else os.path.basename(file) + " " + symbol
        case["problems"], case["row"] = judge_end(lab, SCENARIOS["first"], status, said)
        if case["asked"] == "the launcher" and case["row"] not in ("QVMRL0004E", "QVMRL0046E"):
            case["problems"].append("wrong-row:" + case["row"])
        case["problems"] = case["problems"] + follow_up(lab, SCENARIOS["first"])
    return cases
