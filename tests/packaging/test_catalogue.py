"""The messages, options and properties of docs/*.toml are those of the code, and the pages are made from them."""

import pathlib
import re
import shutil
import subprocess
import sys

import pytest

ROOT = pathlib.Path(__file__).resolve().parents[2]
sys.dont_write_bytecode = True
sys.path.insert(0, str(ROOT / "packaging"))

import catalogue  # noqa: E402

LOGS = pathlib.Path("/mnt/home/VANTOR/RCP/velmora/anna/logs")


def test_the_code_the_files_and_the_pages_agree():
    done = subprocess.run([sys.executable, ROOT / "packaging" / "catalogue.py", "--check"], stdout=subprocess.PIPE, text=True)
    assert (done.returncode, done.stdout) == (0, "")


@pytest.fixture
def tree(tmp_path):
    """A copy of the code and of the files."""
    for folder in ("launcher", "platform", "diag"):
        shutil.copytree(ROOT / folder, tmp_path / folder)
    (tmp_path / "docs").mkdir()
    for name in ("messages", "options", "properties"):
        shutil.copy(ROOT / "docs" / (name + ".toml"), tmp_path / "docs")
    shutil.copy(ROOT / "docs" / "messages.md", tmp_path / "docs")
    shutil.copytree(ROOT / "packaging" / "man", tmp_path / "packaging" / "man")
    return tmp_path


def replaced(path, old, new):
    text = path.read_text()
    assert old in text, "%s is not in %s" % (old, path)
    path.write_text(text.replace(old, new, 1))


# What is broken, and the one line that must come of it.
BREAKAGES = {
    "a text that nobody described": (
        "launcher/startup.cpp", "QVMRL0083E: Unable to create %ls", "QVMRL0083E: Unable to make %ls",
        ['has no entry for the text "QVMRL0083E: Unable to make %ls directory."',
         'the text "QVMRL0083E: Unable to create %ls directory." is nowhere']),
    "a new message": (
        "launcher/startup.cpp", "    createExtensionDirectories(run);\n    rec",
        '    createExtensionDirectories(run);\n    SvcDebugOutA("QVMRL0999I: new");\n    rec',
        ['has no entry for the text "QVMRL0999I: new"']),
    "a new line without a number": (
        "launcher/startup.cpp", "    createExtensionDirectories(run);\n    rec",
        '    createExtensionDirectories(run);\n    SvcDebugOutA("no number");\n    rec',
        ['has no entry for the text "no number"']),
    "a message that no longer ends the start": (
        "platform/linux/lock_file.cpp", 'fatalErrorA("QVMRL0092E: Error reading platform lock file.", EXIT_PROCESS',
        'fatalErrorA("QVMRL0092E: Error reading platform lock file.", GO_ON',
        ['"QVMRL0092E: Error reading platform lock file." does not end the start']),
    "a message that ends the start now": (
        "platform/linux/child_process.cpp", '"Unable to execute %s", path, GO_ON', '"Unable to execute %s", path, EXIT_PROCESS',
        ['"Unable to execute %s" ends the start']),
    "a message handed to somebody unknown": (
        "launcher/main.cpp", 'fatalErrorA("QVMRL0182E', 'somebody("QVMRL0182E',
        ["it cannot be told", 'the text "QVMRL0182E: Set locale error!" is nowhere']),
    "one of two texts of a number": (
        "launcher/command/options.cpp", 'containing \\"java.home\\" - "', 'with \\"java.home\\" - "',
        ['has no entry for the text "QVMRL0192E: velmora invoked with arg with',
         'the text "QVMRL0192E: velmora invoked with arg containing "java.home" - not allowed." is nowhere']),
    "an entry without a message": (
        "docs/messages.toml", '[[message]]\ntext = "QVMRL0002E',
        '[[message]]\ntext = "QVMRL0998E: x"\nends = true\nlogged = "always"\nmeans = "x"\ncauses = "x"\naction = "x"\n\n'
        '[[message]]\ntext = "QVMRL0002E', ['the text "QVMRL0998E: x" is nowhere in the code']),
    "an entry that stands there twice": (
        "docs/messages.toml", '[[message]]\ntext = "QVMRL0305I',
        '[[message]]\ntext = "QVMRL0304I: We are main process"\nends = false\nlogged = "always"\nmeans = "x"\ncauses = "x"\n'
        'action = "x"\n\n[[message]]\ntext = "QVMRL0305I', ["stands there twice"]),
    "an entry without an explanation": (
        "docs/messages.toml", 'action = "Report it."', 'action = ""', ["action is empty"]),
    "an entry with a field too few": (
        "docs/messages.toml", 'action = "Report it."\n', "", ["has other fields"]),
    "an error that is only logged with -debug": (
        "docs/messages.toml", 'ends = false\nlogged = "always"\nmeans = "A line of the installation',
        'ends = false\nlogged = "debug"\nmeans = "A line of the installation', ["every line of an error is logged"]),
    "a new option": (
        "launcher/command/options.cpp", 'L"-restart"', 'L"-again"', ['has no entry for the word "-again"']),
    "an option that is gone": (
        "launcher/command/options.cpp", 'L"-dcommand_only"', "L\"\"", ['the word "-dcommand_only" is nowhere']),
    "an option in other letters": (
        "launcher/command/options.cpp", 'L"-initMUService"', 'L"-initMuService"',
        ['has no entry for the word "-initMuService"', 'the word "-initMUService" is nowhere']),
    "the named arguments under another name": (
        "launcher/properties/vmarg_map.cpp", 'L"vmarg."', 'L"jvmarg."',
        ['has no entry for the key "jvmarg."', 'the key "vmarg." is nowhere', 'the word "vmarg." is nowhere']),
    "a new variable": (
        "launcher/command/child_environment.cpp", 'L"LD_PRELOAD"', 'L"LD_AUDIT"', ['has no entry for the variable "LD_AUDIT"']),
    "a new property": (
        "launcher/provisioning_launch.cpp", 'L"provisioning"', 'L"provisioning.on"',
        ['has no entry for the key "provisioning.on"', "which is looked up", 'the key "provisioning" is nowhere']),
    "a property looked up under a name that is known as something else": (
        "launcher/provisioning_launch.cpp", 'L"provisioning"', 'L"config.ini"',
        ['no entry for the key "config.ini", which is looked up', 'the key "provisioning" is nowhere']),
    "a property that is gone": (
        "launcher/user_area/platform_xml.cpp", 'L"update.policy.managed"', 'L"user"',
        ['the key "update.policy.managed" is nowhere', 'no entry for the key "user", which is looked up']),
    "a property without an entry": (
        "docs/properties.toml", 'key = "eclipse.name"', 'key = "eclipse.executable"',
        ['has no entry for the key "eclipse.name"', "which is looked up", 'the key "eclipse.executable" is nowhere']),
    "a word that is excused and gone": (
        "docs/properties.toml", '"quillonw",', '"quillonw", "quillonx",', ['the key "quillonx" is nowhere']),
}


@pytest.mark.parametrize("breakage", BREAKAGES)
def test_a_disagreement_is_seen(tree, breakage):
    path, old, new, expected = BREAKAGES[breakage]
    assert catalogue.disagreements(tree) == []
    replaced(tree / path, old, new)
    found = catalogue.disagreements(tree)
    for text in expected:
        assert [problem for problem in found if text in problem], (text, found)
    unexpected = [problem for problem in found if not [text for text in expected if text in problem]]
    assert unexpected == []


@pytest.mark.parametrize("page", ["docs/messages.md", "packaging/man/velmora.1", "packaging/man/velmora.properties.5",
                                  "packaging/man/velmora-messages.7"])
def test_a_page_that_was_edited_is_seen(tree, page):
    assert catalogue.stale(tree) == []
    with open(tree / page, "a") as file:
        file.write("x\n")
    assert [problem.partition(":")[0] for problem in catalogue.stale(tree)] == [page]


def test_a_changed_explanation_reaches_its_pages(tree):
    replaced(tree / "docs" / "messages.toml", "The system gave no memory.", "The system is out of memory.")
    assert [problem.partition(":")[0] for problem in catalogue.stale(tree)] == [
        "docs/messages.md", "packaging/man/velmora-messages.7"]


def test_every_number_in_a_page_is_one_that_exists():
    """Pages speak of messages by number; a renumbered message would leave them behind."""
    known = {number for message in catalogue.Catalogue(ROOT)["message"] for number in catalogue.NUMBER.findall(message["text"])}
    pages = [*(ROOT / "docs").glob("*.md"), *(ROOT / "docs").glob("*.toml"), *(ROOT / "packaging" / "man").iterdir()]
    named = {}
    for page in pages:
        if page.name != "decisions.md":
            for number in re.findall(r"QVMRL\d{4}[EIW]", page.read_text()):
                named.setdefault(number, page.name)
    assert {number: page for number, page in named.items() if number not in known} == {}
    assert len(named) > 100


def numbers_logged(*words):
    """The numbers in the logs of a first, a second and a third start."""
    def story(world):
        found = set()
        for number in range(3):
            # Another level each time makes the last start a provisioning run, with a jvm.properties to be read.
            if number == 2:
                pathlib.Path("/mnt/app/rcp/deploy").mkdir()
                pathlib.Path("/mnt/app/rcp/deploy/jvm.properties").write_text("-Dx=${env.NOTHING,y}\nvmarg.Dshare=-Xs\n")
                with open("/mnt/app/rcp/velmora.properties", "a") as file:
                    file.write("provisioning=true\nprovisioning.manifest.version=2\nprovisioning.application=p\n")
            assert world.run(["velmora", "-velmoraWait", *words]) == (0, "", "")
            for log in sorted(LOGS.glob("velmora*.log")):
                found |= set(catalogue.NUMBER.findall(log.read_text()))
        return found
    return story


def test_what_is_logged_always_and_what_with_debug_only(installation):
    always, debug = set(), set()
    for message in catalogue.Catalogue(ROOT)["message"]:
        (always if message["logged"] == "always" else debug).update(catalogue.NUMBER.findall(message["text"]))
    plain = installation.isolated(numbers_logged())
    traced = installation.isolated(numbers_logged("-debug"))
    assert plain <= always
    assert plain >= {"QVMRL0030I", "QVMRL0077I", "QVMRL0119I", "QVMRL0125I", "QVMRL0129I", "QVMRL0130I", "QVMRL0132I",
                     "QVMRL0133I", "QVMRL0303I", "QVMRL0304I", "QVMRL0306I", "QVMRL0090E", "QVMRL0091E"}
    assert traced - plain <= debug
    assert traced - plain >= {"QVMRL0023I", "QVMRL0024I", "QVMRL0032I", "QVMRL0071I", "QVMRL0075I", "QVMRL0076I",
                              "QVMRL0081I", "QVMRL0120I", "QVMRL0126I", "QVMRL0127I"}
