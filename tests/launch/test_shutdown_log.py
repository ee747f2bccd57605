"""shutdown.log: a line for every start of a main process, cut to the last 101 when there are 200."""

import calendar
import os
import time

import pytest

from contents import contents
from world import APP, JAVA, LOG, WORKSPACE, lines, read, user_logs

LOGS = WORKSPACE + "/logs"
HISTORY = LOGS + "/shutdown.log"
CLOCK_REALTIME_COARSE = 5  # of linux/time.h; the module has no name for it
NUMBERED = ["line %d" % number for number in range(1, 401)]


def system_time():
    """What time(2) says: the clock of the last tick, some milliseconds behind time.time() — at the turn of a second,
    still the second before."""
    return int(time.clock_gettime(CLOCK_REALTIME_COARSE))


def started(text, before, after):
    """Is it "Started " and the local time, as the C library writes it, of a moment in between?"""
    assert text.startswith("Started ") and text.endswith("\n") and len(text) == 33
    moment = calendar.timegm(time.strptime(text[8:-1], "%a %b %d %H:%M:%S %Y"))
    assert before <= moment <= after
    # Day numbers are padded with a blank, as in "Started Thu Jan  1 00:00:00 1970".
    assert text == "Started %s\n" % time.asctime(time.gmtime(moment))
    return True


def after_a_start(world, *before):
    """The history that a start leaves of this one; its own line is checked and taken off."""
    world.install()
    world.write(HISTORY, "".join(before))
    return one_start(world)


def one_start(world, history=HISTORY):
    began = system_time()
    assert world.run("-velmoraWait", env={"TZ": "UTC0"}).status == 0
    text = read(history)
    end = text.rfind("Started ")
    assert started(text[end:], began, system_time())
    return text[:end]


def errors():
    return [line for line in read(LOG).splitlines() if line[:10] in ("QVMRL0138E", "QVMRL0105E", "QVMRL0137E")]


# ---- the length

def test_the_first_start_makes_the_log(world):
    world.install()
    assert one_start(world) == ""
    assert contents(LOGS).keys() == {"shutdown.log", "velmora.log"}


def test_every_start_adds_a_line(world):
    world.install()
    one_start(world)
    first = read(HISTORY)
    assert one_start(world) == first


def test_the_time_is_local(world):
    world.install()
    before = system_time()
    world.run(env={"TZ": "XXX-5:30"})
    moment = calendar.timegm(time.strptime(read(HISTORY)[8:-1], "%a %b %d %H:%M:%S %Y")) - (5 * 60 + 30) * 60
    assert before <= moment <= system_time()


def test_no_line_is_lost_of_199(world):
    """198 and this start's."""
    assert after_a_start(world, lines(*NUMBERED[:198])) == lines(*NUMBERED[:198])


def test_200_lines_are_cut_to_the_last_101(world):
    """199 and this start's: from number 100 on."""
    assert after_a_start(world, lines(*NUMBERED[:199])) == lines(*NUMBERED[99:199])
    assert contents(LOGS).keys() == {"shutdown.log", "velmora.log"}
    assert errors() == []


def test_201_lines_are_cut_to_the_last_101(world):
    assert after_a_start(world, lines(*NUMBERED[:200])) == lines(*NUMBERED[100:200])


def test_400_lines_are_cut_to_the_last_101(world):
    assert after_a_start(world, lines(*NUMBERED[:399])) == lines(*NUMBERED[299:399])


def test_after_a_cut_there_is_room_for_99_starts(world):
    """The 98th start after it leaves 199 lines, the 99th makes the next cut."""
    world.install()
    world.write(HISTORY, lines(*NUMBERED[:199]))
    kept = one_start(world)
    for _ in range(98):
        one_start(world)
    assert read(HISTORY).startswith(kept) and read(HISTORY).count("\n") == 199
    one_start(world)
    assert read(HISTORY).count("\n") == 101


# ---- what a line is

@pytest.mark.parametrize("length", [2023, 2024])
def test_the_longest_line_is_one(world, length):
    """With 198 others and this start's, 199 in all."""
    before = lines(*NUMBERED[:197], "x" * length)
    assert after_a_start(world, before) == before


def test_a_longer_line_is_read_in_pieces_and_each_counts(world):
    """One of 2025 characters is two lines, so that 199 are 200; the cut writes it as two."""
    before = lines(*NUMBERED[:197], "x" * 2024 + "y")
    assert after_a_start(world, before) == lines(*NUMBERED[99:197], "x" * 2024, "y")


def test_the_pieces_of_a_line_may_be_cut_apart(world):
    """The hundredth from the end is the second piece."""
    before = lines("x" * 2024 + "y", *NUMBERED[:99])
    assert after_a_start(world, lines(*NUMBERED[100:198]), before) == lines("y", *NUMBERED[:99])


def test_blank_lines_do_not_count_and_are_not_kept(world):
    """They are swallowed with the end of the line before them, and so is indentation."""
    with_blanks = "".join("%s\n\n  \t" % line for line in NUMBERED[:198])
    assert after_a_start(world, with_blanks) == with_blanks
    # Now there are 199, one of them of a start; the next makes it 200.
    text = read(HISTORY)
    kept = one_start(world)
    assert kept == lines(*NUMBERED[99:198]) + text[text.rfind("Started "):]


def test_a_log_that_begins_with_a_blank_line_is_never_cut(world):
    """Its first read fails, so it counts as empty."""
    before = "\n" + lines(*NUMBERED)
    assert after_a_start(world, before) == before


def test_a_last_line_without_its_end_is_gone_on_with(world):
    assert after_a_start(world, "cut") == "cut"


def test_foreign_text_is_kept(world):
    before = lines(*NUMBERED[:198], "größe € %s %n")
    assert after_a_start(world, before) == lines(*NUMBERED[99:198], "größe € %s %n")


# ---- who writes it

def test_a_daemon_process_does_not(world):
    world.install()
    world.plan("wait")
    world.run()
    world.platform()
    before = read(HISTORY)
    world.run()
    assert "-useDaemon" in world.platform(1).argv
    assert read(HISTORY) == before


def test_a_provisioning_run_does(world):
    world.install("user", "provisioning=true", "provisioning.application=org.prov")
    one_start(world)
    assert "-userProvLaunch" in world.only_platform().argv


def test_a_service_has_its_own(world):
    world.install("service", "jvm.location=" + JAVA)
    world.stand_in(JAVA)
    one_start(world, APP + "/eclipse/.workspace/logs/shutdown.log")


# ---- bad input

def test_a_folder_in_its_place_ends_the_start(world):
    world.install()
    world.write(HISTORY + "/mine", "x")
    world.fatal(world.run(), "QVMRL0098E: Could not open %s for writing!" % HISTORY, "Is a directory")
    assert contents(HISTORY) == {"mine": "x"}


def test_a_log_that_may_not_be_written_to_ends_the_start(world):
    world.install()
    world.write(HISTORY, "mine\n", 0o444)
    world.fatal(world.run(), "QVMRL0098E: Could not open %s for writing!" % HISTORY, "Permission denied")
    assert read(HISTORY) == "mine\n"


def test_a_full_disk_ends_the_start(world):
    """What is there stays."""
    world.install()
    world.small_disk("/mnt/small", 4096)
    world.write("/mnt/small/history", "x" * 4095 + "\n")
    world.link(HISTORY, "/mnt/small/history")
    world.fatal(world.run(), "QVMRL0118E: Error writing to %s file." % HISTORY, "No space left on device")
    assert read("/mnt/small/history") == "x" * 4095 + "\n"


def test_a_log_that_is_missing_when_it_is_to_be_cut(world):
    """Somebody has deleted it in between: that is told, and the start goes on."""
    world.install()
    start = world.run("-velmoraWait", strace=["-e", "trace=openat", "-P", HISTORY, "-e",
                                              "inject=openat:error=ENOENT:when=2"])
    assert start.status == 0
    assert errors() == ['QVMRL0138E: Unable to open file."%s"' % HISTORY]
    world.only_platform()


def test_a_folder_in_the_place_of_the_new_log(world):
    """That is told, the log keeps its content, and the start goes on."""
    world.install()
    world.write(HISTORY, lines(*NUMBERED))
    world.write(HISTORY + ".new/mine", "x")
    assert one_start(world) == lines(*NUMBERED)
    assert errors() == ['QVMRL0105E: Unable to open file for writing."%s.new"' % HISTORY]
    assert contents(HISTORY + ".new") == {"mine": "x"}
    world.only_platform()


def test_a_full_disk_for_the_new_log(world):
    """That is told, the log keeps its content, and the start goes on; with room again the cut is made."""
    world.install()
    text = lines(*("%d %s" % (number, "x" * 100) for number in range(400)))
    world.write(HISTORY, text)
    world.small_disk("/mnt/small", 4096)
    world.link(HISTORY + ".new", "/mnt/small/new")
    assert one_start(world) == text
    assert errors() == ['QVMRL0137E: Error while truncating file."%s"' % HISTORY]
    assert user_logs() == [LOG]
    assert not os.path.lexists(HISTORY + ".new")
    one_start(world)
    assert read(HISTORY).count("\n") == 101
    assert len(world.platforms()) == 2


def test_an_interrupted_cut_is_made_again(world):
    """What it left in the new log does not count."""
    world.install()
    world.write(HISTORY + ".new", "left\n")
    world.write(HISTORY, lines(*NUMBERED[:199]))
    assert one_start(world) == lines(*NUMBERED[99:199])
    assert contents(LOGS).keys() == {"shutdown.log", "velmora.log"}
