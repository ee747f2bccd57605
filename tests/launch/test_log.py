"""The log: its whole text for an ordinary start, its place and name, what is held until it opens."""

import calendar
import os
import re
import time

import pytest

from world import (BASE, CONFIG, ECLIPSE, HOME, LAUNCHER, LOG, PROPERTIES, TEMP_LOG, USER_PROPERTIES, WORKSPACE, lines,
                   read, temp_logs, tree, untimed, user_logs)

TRACED = re.compile(r"velmora_(\d{4})(\d\d)(\d\d)_(\d\d)(\d\d)(\d\d)_(\d{3})\.log")
ORDINARY = lines(
    'QVMRL0030I: velmora main arguments="/mnt/app/rcp/velmora, "',
    "",
    "QVMRL0303I: lock file captured @ <time>",
    "QVMRL0090E: Existing platform lock file found - checking validity.",
    "QVMRL0091E: No data in the platform lock file.",
    "QVMRL0304I: We are main process",
    "",
    'QVMRL0119I: VM specified is "external JVM"',
    'QVMRL0125I: No jvm.properties file was loaded. A default file should be at "${rcp.home}/rcp/deploy"',
    "QVMRL0132I: ===== Begin Launch Parameters =====",
    ECLIPSE,
    "--launcher.suppressErrors",
    "-data",
    WORKSPACE,
    "-configuration",
    CONFIG,
    "-startup",
    BASE + "/launcher.jar",
    "-vmargs",
    "-Drcp.home=/mnt/app",
    "-Drcp.data=" + WORKSPACE,
    "-Dcom.vantor.rcp.install.id=abc",
    "-Drcp.install.config=user",
    "-Drcp.osgi.install.area=/mnt/app/rcp/eclipse",
    "QVMRL0133I: ===== End Launch Parameters =====",
    "QVMRL0306I: lock file released @ <time>",
)


def test_the_whole_log_of_an_ordinary_start(world):
    """The held lines, an empty one, then what is always logged: nothing of the trace."""
    world.install()
    world.run()
    assert world.log() == ORDINARY
    assert user_logs() == [LOG]
    assert temp_logs() == []


def test_the_next_start_replaces_the_log(world):
    """The lock file names the platform that has ended, so there is data in it this time."""
    world.install()
    world.run()
    world.all_ended()
    world.run()
    assert world.log() == ORDINARY.replace("QVMRL0091E: No data in the platform lock file.\n", "")


def test_the_whole_log_of_a_daemon_process(world):
    world.install()
    world.plan("wait")
    world.run()
    main = world.platform()
    world.run()
    assert world.log() == ORDINARY.replace("QVMRL0091E: No data in the platform lock file.\n", "").replace(
        "QVMRL0304I: We are main process", "QVMRL0305I: We are daemon process").replace(
        "\n-startup\n", "\n-useDaemon\n%d\n-startup\n" % main.pid)


def test_a_traced_start_has_a_log_of_its_own(world):
    """Its name is the local time to the millisecond."""
    world.install()
    before = time.time()
    world.run("-debug", env={"TZ": "XXX-5:30"})
    after = time.time()
    (path,) = user_logs()
    year, month, day, hour, minute, second, milli = map(int, TRACED.fullmatch(os.path.basename(path)).groups())
    stamp = calendar.timegm((year, month, day, hour, minute, second)) - (5 * 3600 + 30 * 60) + milli / 1000
    assert int(before * 1000) / 1000 <= stamp <= after
    assert os.path.dirname(path) == WORKSPACE + "/logs"


def test_each_traced_start_leaves_its_log(world):
    world.install()
    for _ in range(3):
        world.run("-debug")
        world.all_ended()
    names = [os.path.basename(path) for path in user_logs()]
    assert len(names) == 3 and all(TRACED.fullmatch(name) for name in names)


def test_the_trace_holds_what_is_always_logged_in_the_same_order(world):
    """Tracing adds lines, and takes none away."""
    world.install()
    world.run("-debug")
    traced = iter(untimed(read(user_logs()[0])).splitlines())
    always = [line for line in ORDINARY.splitlines()
              if line and line != "--launcher.suppressErrors" and "arguments" not in line]
    for line in always:
        assert line in traced, "missing, or in another place: " + line


def test_the_time_in_a_line_is_local(world):
    world.install()
    world.run(env={"TZ": "XXX+11"})
    east = read(LOG)
    stamps = re.findall(r"@ (\d{8})_(\d\d)", east)
    now = time.gmtime(time.time() - 11 * 3600)
    just_before = time.gmtime(time.time() - 11 * 3600 - 60)
    allowed = {(time.strftime("%Y%m%d", t), time.strftime("%H", t)) for t in (now, just_before)}
    assert len(stamps) == 2 and set(stamps) <= allowed


@pytest.mark.parametrize("word", ["-Debug", "-debugger", "--debug", "debug"])
def test_only_the_exact_word_turns_tracing_on(world, word):
    world.install()
    world.run(word)
    assert user_logs() == [LOG]
    assert "QVMRL0032I" not in read(LOG)


def test_the_word_counts_after_vmargs_too(world):
    world.install()
    world.run("-vmargs", "-debug")
    assert "QVMRL0023I:   attrib = \"rcp.install.id\"\n" in read(user_logs()[0])


def test_an_extension_may_turn_tracing_off_again(world):
    """The words decide once they are merged: a restart is not traced."""
    world.install("user", "config.a.1=-restart")
    assert world.run("-debug", "-config", "a").status == 0
    assert user_logs() == [LOG]
    assert temp_logs() == []


def test_the_missing_configuration_is_told_only_in_the_trace(world):
    """Then it is the one for a user."""
    world.install(None)
    world.write(USER_PROPERTIES, "rcp.install.id=abc\nrcp.base.location=/mnt/app/base\n")
    message = "QVMRL0041I: Missed install configuration in property file. Using default setting!\n"
    world.run()
    world.all_ended()
    assert message not in read(LOG)
    world.run("-debug")
    (traced,) = set(user_logs()) - {LOG}
    assert message in read(traced)
    assert "-Drcp.install.config=user" in world.platforms()[1].argv


# ---- before the log is open

def test_an_early_error_is_saved_in_tmp(world):
    """All held lines, the error last, and the empty line that follows them."""
    world.install()
    os.unlink(PROPERTIES)
    start = world.run("-x")
    world.fatal(start, "QVMRL0096E: Unable to load /mnt/app/rcp/velmora.properties file!", "No such file or directory")
    assert read(TEMP_LOG) == lines(
        'QVMRL0030I: velmora main arguments="/mnt/app/rcp/velmora, -x, "',
        "",
        "QVMRL0096E: Unable to load /mnt/app/rcp/velmora.properties file! : No such file or directory",
        "",
    )
    assert temp_logs() == [TEMP_LOG]
    assert tree(HOME) == []


def test_an_early_error_replaces_the_one_before(world):
    world.install()
    os.unlink(PROPERTIES)
    world.write(TEMP_LOG, "earlier trouble\n" * 100)
    world.run()
    assert "earlier" not in read(TEMP_LOG)


def test_an_early_error_of_a_traced_start_has_a_file_of_its_own(world):
    world.install()
    os.unlink(PROPERTIES)
    world.fatal(world.run("-debug"), "QVMRL0096E: Unable to load /mnt/app/rcp/velmora.properties file!",
                "No such file or directory")
    assert [bool(TRACED.fullmatch(os.path.basename(path))) for path in temp_logs()] == [True]


def test_a_good_start_clears_the_plain_file_in_tmp_away(world):
    """And nothing else there."""
    world.install()
    world.write(TEMP_LOG)
    for other in ("/tmp/velmora_20111024_093015_042.log", "/tmp/velmora.log.old"):
        world.write(other)
    world.run()
    assert tree("/tmp") == ["0644 velmora.log.old", "0644 velmora_20111024_093015_042.log"]


def test_a_start_that_fails_later_has_cleared_it_away_too(world):
    """As soon as the real log is open."""
    world.install("user", "eclipse.name=gone")
    world.write(TEMP_LOG)
    assert world.run().status == 255
    assert temp_logs() == []


def test_a_file_in_tmp_that_cannot_be_read_counts_as_absent(world):
    world.install()
    world.write(TEMP_LOG, "", 0o000)
    assert world.run().status == 0
    assert tree("/tmp") == ["0000 velmora.log"]


@pytest.mark.parametrize("in_the_way, reason", [("folder", "Is a directory"), ("mode", "Permission denied")])
def test_a_log_that_cannot_be_opened_ends_the_start(world, in_the_way, reason):
    """The error line is the last of the held ones; no further message is made of it."""
    world.install()
    if in_the_way == "folder":
        world.folder(LOG)
    else:
        world.folder(os.path.dirname(LOG), 0o555)
    start = world.run()
    assert (start.status, world.platforms()) == (255, [])
    assert untimed(read(TEMP_LOG)) == ORDINARY[:ORDINARY.index("\n\nQVMRL0119I")] + lines(
        "", "QVMRL0019E: Could not open %s for writing! : %s" % (LOG, reason), "")
    assert not os.path.exists(CONFIG)


def test_a_traced_log_that_cannot_be_opened_ends_the_start(world):
    """The held lines get a file of their own in /tmp."""
    world.install()
    world.folder(os.path.dirname(LOG), 0o555)
    start = world.run("-debug")
    assert (start.status, world.platforms()) == (255, [])
    (saved,) = temp_logs()
    assert TRACED.fullmatch(os.path.basename(saved))
    (error,) = re.findall(r"^QVMRL0019E: .*\n\n\Z", read(saved), re.M)
    assert re.sub(TRACED, "<traced>", error) == (
        "QVMRL0019E: Could not open %s/logs/<traced> for writing! : Permission denied\n\n" % WORKSPACE)
    assert not os.path.exists(CONFIG)


def test_when_no_log_can_be_opened_the_status_is_all_that_is_left(world):
    world.install()
    world.folder(LOG)
    world.folder(TEMP_LOG)
    start = world.run()
    assert (start.status, world.platforms()) == (255, [])
    assert tree("/tmp") == ["0755 velmora.log/"]


def test_a_fatal_error_after_the_log_is_open_goes_there(world):
    """It is the last line; nothing comes to /tmp."""
    world.install("user", "eclipse.name=gone")
    start = world.run()
    world.fatal(start, "QVMRL0007E: %s/linux/x86/gone is not executable or does not exist." % BASE,
                "No such file or directory")
    assert world.log().startswith('QVMRL0030I: velmora main arguments="%s, "\n\n' % LAUNCHER)
    assert temp_logs() == []
