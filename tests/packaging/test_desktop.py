"""The desktop's entries, and what a link can bring about; the kiosk's unit and its limit."""

import configparser
import pathlib
import subprocess
import time
import xml.etree.ElementTree

import pytest

from conftest import APP, ROOT, needs

DESKTOP = ROOT / "packaging" / "desktop"
UNIT = ROOT / "packaging" / "kiosk" / "velmora-kiosk@.service"
LOG = "/mnt/home/VANTOR/RCP/velmora/anna/logs/velmora.log"
LINK = "velmora:open/7?a=b%20c"


def entry(name):
    parser = configparser.ConfigParser(interpolation=None)
    parser.optionxform = str
    parser.read(DESKTOP / name, encoding="utf-8")
    return parser["Desktop Entry"]


def expanded(name, *links):
    """The words that a desktop starts for the entry: %u becomes the link as one word, or nothing."""
    words = []
    for word in entry(name)["Exec"].split(" "):
        words += list(links) if word == "%u" else [word]
    return [word.replace("/usr/lib/velmora/", APP + "/") for word in words]


# ---- Their own checkers

@pytest.mark.parametrize("name", ["velmora.desktop", "velmora-link.desktop"])
def test_an_entry_is_valid(name):
    done = subprocess.run([needs("desktop-file-validate", "desktop-file-utils"), DESKTOP / name], stdout=subprocess.PIPE,
                          stderr=subprocess.STDOUT, text=True)
    assert (done.returncode, done.stdout) == (0, "")


def test_the_metadata_is_valid():
    done = subprocess.run([needs("appstreamcli", "appstream"), "validate", "--no-net", "--pedantic", "--explain",
                           DESKTOP / "com.vantor.velmora.metainfo.xml"], stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
    assert done.returncode == 0, done.stdout
    found = [line for line in done.stdout.splitlines() if line.startswith(("E:", "W:", "I:"))]
    assert found == []


def test_the_metadata_names_the_entry_and_the_version():
    tree = xml.etree.ElementTree.parse(DESKTOP / "com.vantor.velmora.metainfo.xml")
    assert tree.findtext("launchable") == "velmora.desktop"
    version = (ROOT / "CMakeLists.txt").read_text().partition("project(velmora VERSION ")[2].partition(" ")[0]
    assert tree.find("releases/release").get("version") == version
    assert (ROOT / "packaging" / "debian" / "changelog").read_text().startswith("velmora (%s) " % version)


def test_the_icon_is_a_picture_that_scales():
    root = xml.etree.ElementTree.parse(DESKTOP / "velmora.svg").getroot()
    assert root.tag == "{http://www.w3.org/2000/svg}svg" and root.get("viewBox") == "0 0 128 128"
    assert entry("velmora.desktop")["Icon"] == entry("velmora-link.desktop")["Icon"] == "velmora"


def test_only_the_hidden_entry_takes_links():
    menu, link = entry("velmora.desktop"), entry("velmora-link.desktop")
    assert "MimeType" not in menu and "NoDisplay" not in menu and "%" not in menu["Exec"]
    assert (link["MimeType"], link["NoDisplay"]) == ("x-scheme-handler/velmora;", "true")


# ---- With the real launcher

def test_the_menu_starts_the_platform_without_a_link(installation):
    words = expanded("velmora.desktop")  # here: the world's user may not enter what the clone lies in
    assert words == ["velmora"]

    def story(world):
        return world.run(words + ["-velmoraWait"]), len(world.starts())
    assert installation.isolated(story) == ((0, "", ""), 1)


def started_with(words):
    def story(world):
        result = world.run(words)
        deadline = time.monotonic() + 10
        # The launcher does not wait for the platform.
        while result[0] == 0 and not world.starts() and time.monotonic() < deadline:
            time.sleep(0.01)
        log = pathlib.Path(LOG)
        return result, world.starts(), log.read_text() if log.exists() else "".join(
            path.read_text() for path in pathlib.Path("/tmp").glob("velmora*.log"))
    return story


@pytest.mark.parametrize("link", [LINK, "velmora:", "velmora:a b -vmargs", "velmora:%s%n"])
def test_a_link_reaches_the_platform_as_one_word(installation, link):
    result, starts, _ = installation.isolated(started_with(expanded("velmora-link.desktop", link)))
    assert result == (0, "", "")
    assert len(starts) == 1
    words = starts[0]
    at = words.index("-maxargcnt")
    assert words[at:at + 3] == ["-maxargcnt", "4", link]


REFUSED_BY_THE_COUNT = "QVMRL0069E: velmora invoked with an invalid URL handler action - bad argument count."


@pytest.mark.parametrize("link", [
    [LINK, "-resetconfig"], [LINK, "-vmargs", "-Dx=y"], [LINK, "-maxargcnt", "6"], ["-maxargcnt", "5", LINK],
    [LINK, "-restart", "-resetconfig"], [], ["-restart"], [LINK, "vmarg.a=-Dx=y"]])
def test_the_count_refuses_a_link_that_was_split(installation, link):
    """The guard by itself, without open-link in front of it."""
    result, starts, log = installation.isolated(started_with(["velmora", "-maxargcnt", "4", *link]))
    assert result == (255, "", "") and starts == []
    assert log.rstrip("\n").splitlines()[-1].startswith(REFUSED_BY_THE_COUNT + " : ")


@pytest.mark.parametrize("link", [
    [], ["-restart"], ["-resetconfig"], [LINK, "-restart"], ["-restart", LINK], [LINK, "-resetconfig"], [""], ["Velmora:x"],
    ["vmarg.a=-Dx=y"], ["-vmargs"], [LINK, LINK]])
def test_open_link_takes_one_link_and_nothing_else(installation, link):
    """Also what the count cannot see: -restart, and an option in the place of the link."""
    result, starts, log = installation.isolated(started_with(expanded("velmora-link.desktop", *link)))
    assert result == (255, "", 'open-link: one word, a link that begins with "velmora:", is needed\n')
    assert (starts, log) == ([], "")


def test_without_open_link_the_count_misses_a_restart(installation):
    """Why open-link is there: -restart is not counted."""
    result, starts, _ = installation.isolated(started_with(["velmora", "-maxargcnt", "4", LINK, "-restart"]))
    assert result == (0, "", "") and len(starts) == 1


@pytest.mark.parametrize("link, message", [
    ('velmora:a"b', "QVMRL0089E"), ("velmora:java.home", "QVMRL0192E"), ("velmora:java.library.path", "QVMRL0191E"),
    ("velmora:jvm.library.path", "QVMRL0190E")])
def test_a_link_with_a_forbidden_text_is_refused(installation, link, message):
    result, starts, log = installation.isolated(started_with(expanded("velmora-link.desktop", link)))
    assert result == (255, "", "") and starts == []
    assert log.rstrip("\n").splitlines()[-1].startswith(message + ": ")


# ---- The kiosk's unit

def unit(text):
    parser = configparser.ConfigParser(interpolation=None, strict=False)
    parser.optionxform = str
    parser.read_string(text)
    return parser


def trips(text, shortest_run):
    """Whether a start that fails each time at once meets the limit."""
    found = unit(text)
    burst, pause = int(found["Unit"]["StartLimitBurst"]), float(found["Service"]["RestartSec"])
    return burst * (pause + shortest_run) < float(found["Unit"]["StartLimitIntervalSec"])


def failing_start(world):
    """The seconds of the shortest run: one that ends before anything is made."""
    pathlib.Path(APP, "rcp", "velmora.properties").unlink()
    seconds = []
    for _ in range(3):
        began = time.monotonic()
        status, _, _ = world.run(["velmora"])
        seconds.append(time.monotonic() - began)
        assert status == 255
    return min(seconds)


def test_the_restart_limit_of_the_kiosk_can_trip(installation):
    text = UNIT.read_text()
    assert unit(text)["Service"]["Restart"] == "always"
    assert trips(text, installation.isolated(failing_start))
    # Room for a run that takes a while before it fails: a slow disk, a wait of 20 seconds for an old platform.
    assert trips(text, 25)


def test_a_restart_limit_that_cannot_trip_is_seen():
    text = UNIT.read_text()
    assert not trips(text.replace("RestartSec=5", "RestartSec=60"), 0)
    assert not trips(text.replace("StartLimitIntervalSec=300", "StartLimitIntervalSec=25"), 0)
    assert not trips(text.replace("StartLimitBurst=5", "StartLimitBurst=60"), 0)
    assert trips(text.replace("StartLimitIntervalSec=300", "StartLimitIntervalSec=26"), 0)


def test_the_kiosk_loads_its_library_from_the_rcp_home():
    service = unit(UNIT.read_text())["Service"]
    assert service["WorkingDirectory"] == "/usr/lib/velmora/rcp"
    assert (service["User"], service["KillMode"], service["ExecStart"]) == ("%i", "control-group", "/usr/bin/velmora")


def test_the_unit_is_understood_by_systemd(tmp_path):
    """With programs and pages that exist here, since the package is not installed."""
    copy = tmp_path / UNIT.name
    text = UNIT.read_text().replace("/usr/bin/velmora", "/bin/true").replace("/usr/lib/velmora/rcp", "/")
    copy.write_text("".join(line for line in text.splitlines(True) if not line.startswith("Documentation=")))
    done = subprocess.run([needs("systemd-analyze", "systemd"), "verify", "--man=no", "--recursive-errors=no",
                           str(tmp_path / "velmora-kiosk@anna.service")], stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
    assert [line for line in done.stdout.splitlines() if "velmora-kiosk" in line] == []
