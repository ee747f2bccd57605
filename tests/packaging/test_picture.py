"""The picture of the README: how packaging/picture.py draws, and that docs/demo.svg shows the ./demo of today."""

import re
import subprocess
import sys
import xml.etree.ElementTree as ElementTree

import pytest

from conftest import ROOT

sys.path.insert(0, str(ROOT / "packaging"))

import picture  # noqa: E402

TEXT = "{http://www.w3.org/2000/svg}text"
COMMITTED = ROOT / "docs" / "demo.svg"

PRINTED = """\
Building it; this takes a minute.

A <first> chapter
-----------------

$ velmora -data "a & b"

It says:

  | one   <two>
  |   ]]> &amp;

  .config/      the user's
"""


def drawn(text):
    """[(kind, line)] of the terminal's content."""
    return [(element.get("class"), "".join(element.itertext()))
            for element in ElementTree.fromstring(text).iter(TEXT) if element.get("class") != "title"]


def quotation(count):
    return "".join("  | %d\n" % number for number in range(1, count + 1))


def chapter(name, count):
    return "\n%s\n%s\n\n" % (name, "-" * len(name)) + "".join("%s: line %d\n" % (name, i) for i in range(1, count + 1))


def refused(output):
    with pytest.raises(SystemExit) as ended:
        picture.picture(output)
    return str(ended.value)


def test_every_line_is_drawn_with_its_characters():
    text = picture.picture(PRINTED)
    assert drawn(text) == [
        ("heading", "A <first> chapter"),
        ("command", '$ velmora -data "a & b"'),
        ("plain", "It says:"),
        ("quoted", "  | one   <two>"),
        ("quoted", "  |   ]]> &amp;"),
        ("plain", "  .config/      the user's"),
    ]
    assert "A &lt;first&gt; chapter" in text and "&amp;amp;" in text


def test_blanks_are_kept_and_lines_stand_below_each_other_inside_the_picture():
    root = ElementTree.fromstring(picture.picture(PRINTED))
    assert root.get("{http://www.w3.org/XML/1998/namespace}space") == "preserve"
    places = [int(element.get("y")) for element in root.iter(TEXT) if element.get("class") != "title"]
    steps = [after - before for before, after in zip(places, places[1:])]
    # An empty line stands after the heading, the command, "It says:" and the quotation.
    assert steps == [28, 28, 28, 19, 28]
    assert places[-1] < int(root.get("height"))
    # The longest line has 26 characters; one of 14 px is at most 8.43 px wide.
    assert int(root.get("width")) >= 26 * 8.43 + 2 * 22 - 1


def test_a_long_quotation_is_cut_and_says_so():
    begin = "T\n-\n"
    assert [line for _, line in drawn(picture.picture(begin + quotation(8)))] == ["T"] + ["  | %d" % i for i in range(1, 9)]
    assert drawn(picture.picture(begin + quotation(9)))[-2:] == [("quoted", "  | 7"), ("left-out", "  | ... and 2 more lines")]
    # Each quotation for itself.
    both = [line for _, line in drawn(picture.picture(begin + quotation(5) + "\n" + quotation(5)))]
    assert both == ["T"] + ["  | %d" % i for i in range(1, 6)] * 2


def test_late_chapters_are_shown_as_headings():
    # 40 lines with the second heading: that chapter is shown.
    shown = drawn(picture.picture(chapter("A", 38) + chapter("B", 3)))
    assert [line for _, line in shown][-4:] == ["B", "B: line 1", "B: line 2", "B: line 3"]
    assert not [line for kind, line in shown if kind == "left-out"]
    # With one line more in front it is not, nor is the one that follows.
    shown = drawn(picture.picture(chapter("A", 39) + chapter("B", 3) + chapter("C", 1)))
    assert shown[-5:] == [("plain", "A: line 39"), ("heading", "B"), ("left-out", "..."), ("heading", "C"), ("left-out", "...")]


@pytest.mark.parametrize("line", ["/opt/velmora", "log is /tmp/velmora.log", "-Da=/srv/x", "'/x'", "a:/.b"])
def test_a_path_of_the_machine_is_refused(line):
    assert "a path of this machine" in refused("T\n-\n" + line + "\n")


@pytest.mark.parametrize("line", ["build/demo/platform", "~/.exitData", ".config/config.ini", "and / or", "-Da=b/c"])
def test_a_path_from_the_project_on_is_none_of_the_machine(line):
    assert drawn(picture.picture("T\n-\n" + line + "\n")) == [("heading", "T"), ("plain", line)]


def test_what_cannot_be_drawn_is_refused():
    assert "cannot be drawn" in refused("T\n-\na\x1b[1mb\n")
    assert "no heading" in refused("nothing\nof it\n")
    assert "no heading" in refused("")


def test_the_command_writes_what_it_draws_from_a_file(tmp_path):
    for folder in ("packaging", "docs"):
        (tmp_path / folder).mkdir()
    script = tmp_path / "packaging" / "picture.py"
    script.write_bytes((ROOT / "packaging" / "picture.py").read_bytes())
    (tmp_path / "printed").write_text(PRINTED)
    command = [sys.executable, "-B", script]

    done = subprocess.run(command + [tmp_path / "printed"], stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
    assert (done.returncode, done.stdout) == (0, "")
    made = (tmp_path / "docs" / "demo.svg").read_text()
    assert len(drawn(made)) == 6

    # A ./demo that fails leaves the picture as it was; one that succeeds is drawn.
    demo = tmp_path / "demo"
    demo.write_text("#!/bin/sh\nprintf 'T\\n-\\nx\\n'\nexit 3\n")
    demo.chmod(0o755)
    done = subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
    assert (done.returncode, done.stdout) == (1, "error: ./demo ended with status 3\n")
    assert (tmp_path / "docs" / "demo.svg").read_text() == made
    demo.write_text("#!/bin/sh\nprintf 'T\\n-\\nx\\n'\n")
    done = subprocess.run(command, stdout=subprocess.PIPE, stderr=subprocess.STDOUT, text=True)
    assert (done.returncode, done.stdout) == (0, "")
    assert drawn((tmp_path / "docs" / "demo.svg").read_text()) == [("heading", "T"), ("plain", "x")]


def headings_of_the_demo():
    """Those that ./demo prints when it is given no word, read from the script."""
    functions = dict(re.findall(r"^(\w+)\(\) \{\n(.*?)^\}", (ROOT / "demo").read_text(), re.M | re.S))
    story = re.search(r"case \$story in\n.*?^ *\*\)\n(.*?);;", functions["main"], re.M | re.S).group(1)
    order = ["main"] + re.findall(r"^ *(show_\w+)$", story, re.M)
    return [text for name in order for text in re.findall(r'^ *heading "(.*)"$', functions[name], re.M)]


def test_the_committed_picture_has_the_headings_of_the_demo():
    expected = headings_of_the_demo()
    assert len(expected) >= 2 and not [text for text in expected if "$" in text or "\\" in text]
    shown = [line for kind, line in drawn(COMMITTED.read_text()) if kind == "heading"]
    assert shown == expected, "./demo has changed: run packaging/picture.py"


def test_the_committed_picture_is_drawn_by_this_script_and_holds_no_path_of_a_machine():
    lines = drawn(COMMITTED.read_text())
    assert 40 <= len(lines) <= 70
    # The lines, drawn again, give the same bytes but for the empty ones: those are seen in the places alone.
    again = ElementTree.fromstring(picture.render(lines))
    committed = ElementTree.fromstring(COMMITTED.read_text())
    def without_places(root):
        return [(element.tag, element.get("class"), element.get("x"), element.text) for element in root.iter()]
    assert without_places(again) == without_places(committed)
    for element in committed.iter():
        for value in [element.text or "", *element.attrib.values()]:
            assert not re.search(r"(?:^|[\s='\":,(])/[^\s/]", value), value


def test_the_readme_shows_it_on_its_first_screen():
    found = re.search(r"!\[([^]]+)\]\(docs/demo\.svg\)", (ROOT / "README.md").read_text())
    assert len(found.group(1)) > 20
    before = (ROOT / "README.md").read_text()[:found.start()]
    assert before.count("\n") <= 20 and "## " not in before
    assert "`packaging/picture.py`" in before
