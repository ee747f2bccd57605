"""The kiosk: velmora supervises the platform until it asks for the session's end."""

import os

from example import APP, HOME, LOCK, WORKSPACE, launched, read

FIRST_RUN = ["The platform runs.", "Run 1: it ends without a word, as after a crash."]
LAST_RUN = ["The platform runs.", 'Run 2: it asks for the end of the session ("logoff" in ~/.exitData).']
SESSION_LIBRARY = "lockdown.so: the desktop session would end here."


def test_a_platform_that_ends_without_a_word_is_started_again_until_it_asks_for_logoff(example):
    example.configure("install.configuration", "lockdown")
    kiosk = example.run("-demoBrief", "-demoLogoffAt", "2")
    assert kiosk.printed().splitlines() == FIRST_RUN + LAST_RUN + [SESSION_LIBRARY]
    assert read(HOME + "/.exitData") == "logoff"
    assert not os.path.exists("/tmp/tzn_shutdown")


def test_a_kiosks_platform_is_told_so(example):
    example.configure("install.configuration", "lockdown")
    report = example.run("-demoLogoffAt", "1").report()
    assert report["install config"] == ["lockdown"]
    assert report["workspace"] == [WORKSPACE]
    assert read(LOCK) == report["process"][0] + " " * 10
    assert launched()[0] == APP + "/rcp/eclipse/plugins/base/linux/x86/eclipse"


def test_what_an_earlier_session_left_is_removed_first(example):
    example.configure("install.configuration", "lockdown")
    with open(HOME + "/.exitData", "w", encoding="utf-8") as file:
        file.write("logoff")
    kiosk = example.run("-demoBrief", "-demoLogoffAt", "2")
    assert kiosk.printed().splitlines() == FIRST_RUN + LAST_RUN + [SESSION_LIBRARY]
