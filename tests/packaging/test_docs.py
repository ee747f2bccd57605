"""Every command line of the documents, and those of velmora(1), do what they are there for."""

import pathlib
import re
import shutil
import subprocess

import pytest

import blocks
from conftest import ROOT, needs

BY_USERS = [page.name for page in blocks.pages() if "sh" in [kind for kind, _ in blocks.blocks(page)]]


def test_the_pages_with_command_lines_are_found():
    assert BY_USERS == ["administrators.md", "interrupted-resets.md", "support.md"]


@pytest.mark.parametrize("page", blocks.pages(), ids=lambda page: page.name)
def test_a_command_line_stands_in_a_block_that_is_run(page):
    """So that none escapes: neither in a block of another kind nor in running text, nor behind a prompt."""
    text = page.read_text()
    if page.name == "decisions.md":
        return
    assert {kind for kind, _ in blocks.blocks(page)} <= set(blocks.KINDS)
    assert text.count("```") == 2 * len(blocks.blocks(page))
    assert re.findall(r"^\s*[$#] ?(?:velmora|\./|sudo|apt|cmake)\b.*", text, re.M) == []
    inline = re.findall(r"`((?:velmora|man|ls|rm|cat|grep|tail|head|systemctl|apt-get|dpkg|cmake|ctest|mv|cp|kill|chmod|echo)\s[^`]*)`", text)
    assert inline == []


WORKSPACE = pathlib.Path("/mnt/home/VANTOR/RCP/velmora/anna")
UPDATE = WORKSPACE / ".config" / "org.eclipse.update"


def interrupted_reset(installation):
    """The configuration has become the backup, and the copies are not moved back; the next start has begun a new one."""
    for name in ("registry", "bookmarks.xml"):
        (UPDATE / name).write_text(name + " of before\n")
        (WORKSPACE / (name + ".old")).write_text(name + " of before\n")
    (WORKSPACE / ".config").rename(WORKSPACE / ".configbak")
    assert installation.run(["velmora", "-velmoraWait"]) == (0, "", "")
    assert UPDATE.is_dir() and not (UPDATE / "registry").exists()


def run_in_order(commands, before=lambda _: None):
    def story(installation):
        # A user who has started before: there are logs to look at.
        assert installation.run(["velmora", "-velmoraWait"]) == (0, "", "")
        before(installation)
        done = []
        for text in commands:
            done.append((text, installation.run(["bash", "-eu", "-o", "pipefail", "-c", text])))
        return done
    return story


@pytest.mark.parametrize("page", BY_USERS)
def test_the_command_lines_of_a_page_run(installation, page):
    needs("man", "man-db")
    needs("pgrep", "procps")
    commands = [text for kind, text in blocks.blocks(ROOT / "docs" / page) if kind == "sh"]
    before = [interrupted_reset] if page == "interrupted-resets.md" else []
    for text, (status, out, err) in installation.isolated(run_in_order(commands, *before)):
        assert (status, err) == (0, ""), text
        # Each of them shows something, but those that start or reset.
        assert out != "" or text.startswith("velmora "), text


def said_by(done, beginning):
    return [out for text, (_, out, _) in done if text.startswith(beginning)]


def test_what_support_finds(installation):
    needs("man", "man-db")
    commands = [text for kind, text in blocks.blocks(ROOT / "docs" / "support.md") if kind == "sh"]
    done = installation.isolated(run_in_order(commands))
    log = "/mnt/home/VANTOR/RCP/velmora/anna/logs/velmora.log\n"
    assert said_by(done, "ls -t") == [log]
    assert said_by(done, "head -n 1") == ['QVMRL0030I: velmora main arguments="velmora, -velmoraWait, "\n']
    found, _, rest = said_by(done, "readlink")[0].partition("\n")
    assert found == "/mnt/app/rcp/velmora" and rest.endswith("\nstarted\n")
    assert "QVMRL0306I" in said_by(done, "tail -n 3")[0]
    page = said_by(done, "man velmora-messages")[0]
    assert "QVMRL0083E: Unable to create %ls directory." in page and "Ends the start with status 255." in page
    decided = said_by(done, "log=$(ls")[0].splitlines()
    assert decided[0] == "QVMRL0304I: We are main process" and re.fullmatch(r"[0-9]+ {4}", decided[1])
    assert said_by(done, "pgrep") == ["velmora does not run\n"]
    assert re.fullmatch(r'QVMRL0031I:   version = "20131002.1404" : .*\n', said_by(done, "velmora -debug\nvelmora -version")[0])


def test_what_a_reset_does(installation):
    commands = [text for kind, text in blocks.blocks(ROOT / "docs" / "administrators.md") if kind == "sh"]
    assert commands == ["velmora -resetconfig\n"]

    def story(world):
        run_in_order(commands)(world)
        return world.run(["ls", "-A", "/mnt/home/VANTOR/RCP/velmora/anna"])
    assert ".configbak" in installation.isolated(story)[1].splitlines()


def test_what_an_interrupted_reset_left_is_brought_back(installation):
    commands = [text for kind, text in blocks.blocks(ROOT / "docs" / "interrupted-resets.md") if kind == "sh"]

    def story(world):
        run_in_order(commands, interrupted_reset)(world)
        return [(UPDATE / name).read_text() for name in ("registry", "bookmarks.xml")], sorted(
            path.name for path in WORKSPACE.glob("*.old"))
    assert installation.isolated(story) == (["registry of before\n", "bookmarks.xml of before\n"], [])


def test_the_examples_of_the_manual_run(installation):
    page = (ROOT / "packaging" / "man" / "velmora.1").read_text()
    examples = [text.strip().replace("\\-", "-").replace("\\(ti", "~")
                for text in re.findall(r"^\.nf\n(.*?)^\.fi\n", page.partition(".SH EXAMPLES")[2], re.M | re.S)]
    assert len(examples) == 4

    def story(world):
        return run_in_order(examples)(world), world.starts()
    done, starts = installation.isolated(story)
    for text, (status, out, err) in done:
        assert (status, err) == (0, ""), text
    assert done[3][1][1].startswith("QVMRL0132I") and "\n" + "-data\n" in done[3][1][1]
    second = [words for words in starts if "/mnt/home/second" in words]
    assert len(second) == 1 and "-Xmx2g" in second[0] and "-velmoraWait" in second[0]


def test_the_command_lines_for_contributors_run(tmp_path):
    for folder in ("docs", "packaging", "launcher", "platform", "diag", "tests/lint"):
        shutil.copytree(ROOT / folder, tmp_path / folder)
    commands = [text for kind, text in blocks.blocks(ROOT / "docs" / "contributors.md") if kind == "sh tree"]
    assert commands
    for text in commands:
        done = subprocess.run(["bash", "-eu", "-c", text], cwd=tmp_path, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
        assert (done.returncode, done.stdout) == (0, ""), text


@pytest.mark.parametrize("page", ["README.md", "CONTRIBUTING.md", "example/README.md"])
def test_the_commands_at_the_top_are_there_and_know_their_words(page):
    """What these pages tell to be typed, held against the words that the scripts look for."""
    found = re.findall(r"(?:^    |`)\./(\w+)((?: --\w+)*)", (ROOT / page).read_text(), re.M)
    assert found
    for name, options in found:
        done = subprocess.run([ROOT / name, "--help"], stdout=subprocess.PIPE, text=True)
        assert done.returncode == 0
        for option in options.split():
            assert re.search(r"^ +%s\)" % option, (ROOT / name).read_text(), re.M), (name, option)


def test_links_between_the_pages_lead_somewhere():
    for page in [*blocks.pages(), *(ROOT / name for name in ("README.md", "CONTRIBUTING.md", "example/README.md"))]:
        for target in re.findall(r"\]\(([^)#:]+)\)", page.read_text()):
            assert (page.parent / target).exists(), "%s: %s" % (page.name, target)


def kiosk_examples():
    page = (ROOT / "packaging" / "man" / "velmora-kiosk.7").read_text()
    return [text.strip().replace("\\-", "-").replace("\\&", "") + "\n"
            for text in re.findall(r"^\.nf\n(.*?)^\.fi\n", page, re.M | re.S)]


def only(texts, piece):
    found = [text for text in texts if piece in text]
    assert len(found) == 1, piece
    return found[0]


def test_the_session_library_of_the_manual_is_one(tmp_path):
    (tmp_path / "lockdown.c").write_text(only(kiosk_examples(), "bool logoff(void)"))
    command = only(kiosk_examples(), "cc ").strip()
    done = subprocess.run(command, shell=True, cwd=tmp_path, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
    assert (done.returncode, done.stdout) == (0, "")
    exported = subprocess.run(["nm", "-D", "--defined-only", "lockdown.so"], cwd=tmp_path, stdout=subprocess.PIPE, text=True)
    assert re.search(r" T logoff$", exported.stdout, re.M)


def test_the_script_of_the_manual_hands_the_words_on_and_pauses(tmp_path):
    script = only(kiosk_examples(), "sleep 5")
    assert script.startswith("#!/bin/sh\n") and script.endswith("\nsleep 5\n")
    (tmp_path / "kiosk-eclipse").write_text(script.replace("sleep 5", "echo pause"))
    (tmp_path / "eclipse").write_text('#!/bin/sh\nprintf "<%s>" "$@"\n')
    for name in ("kiosk-eclipse", "eclipse"):
        (tmp_path / name).chmod(0o755)
    done = subprocess.run([tmp_path / "kiosk-eclipse", "-data", "a b"], stdout=subprocess.PIPE, text=True)
    assert (done.returncode, done.stdout) == (0, "<-data><a b>pause\n")
