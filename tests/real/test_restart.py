"""A restart that the platform asks for: its supervisor reads args.properties as any Java program would."""

import pathlib

from example import (LAUNCHER, LOCK, LOG, RECORDED_WORDS, SUPERVISOR, children_looked_at, lines, process_with, read,
                     reports)
from world import until


def test_a_restart_is_made_from_the_recorded_words(example):
    start = example.run(LAUNCHER, "-velmoraWait", "-config", "greeting", "-demoRestart", command=SUPERVISOR)
    first, second = reports(start.printed())
    words = ["--launcher.suppressErrors", "-velmoraWait", "-demoRestart", "-greeting", "Hello from the extension"]
    assert (first["arguments"], second["arguments"]) == (words, words)
    assert second["says"] == ["The platform runs, and was given:",
                              "This is the restart that it asked for; it does not ask again."]
    old = first["process"][0]
    assert read(LOCK) == second["process"][0] + " " * 10
    # The supervisor starts what was recorded, and the words of a restart.
    assert read(LOG).splitlines()[0] == (
        'QVMRL0030I: velmora main arguments="%s, -velmoraWait, -config, greeting, -demoRestart, -restart, '
        '-rcp_old_pid, %s, "' % (LAUNCHER, old))
    # A restart records no words of its own: the next one is made from the same.
    assert read(RECORDED_WORDS) == lines(
        "arg0=" + LAUNCHER,
        "arg1=-velmoraWait",
        "arg2=-config",
        "arg3=greeting",
        "arg4=-demoRestart",
        "argc=5",
        "com.vantor.rcp.core.internal.librarypath=",
    )


def test_java_reads_back_what_was_recorded(example):
    odd = ["#a=b:c!d", " blanks at both ends ", "back\\slash \\u0041 \\", "größe €", "tab\there", "100 %s", ""]
    start = example.run(LAUNCHER, "-velmoraWait", "-demoRestart", *odd, command=SUPERVISOR)
    first, second = reports(start.printed())
    assert first["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-demoRestart", *odd]
    # A value in a properties file begins after the blanks, so a leading one cannot come back.
    odd[1] = "blanks at both ends "
    assert second["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-demoRestart", *odd]


def test_a_restart_waits_for_the_old_platform(example):
    start = example.start(LAUNCHER, "-velmoraWait", "-demoRestart", "-demoStayUntil", "/mnt/leave", command=SUPERVISOR)
    restart = process_with("-restart")
    until(lambda: children_looked_at(restart), "the restart has asked whether the old platform lives")
    assert len(reports(start.printed())) == 1
    pathlib.Path("/mnt/leave").touch()
    first, second = reports(start.wait().printed())
    assert read(LOCK) == second["process"][0] + " " * 10
    log = read(LOG).splitlines()
    assert "QVMRL0304I: We are main process" in log
    # Once with the old platform alive, once without, and once more under the lock.
    assert log.count("QVMRL0090E: Existing platform lock file found - checking validity.") >= 3
    assert "QVMRL0013E: Existing platform has not shutdown within allotted time. " \
           "Invalidating the lockfile for new launch." not in log
