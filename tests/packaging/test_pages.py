"""The manual pages are clean for the formatters' own checks."""

import re
import subprocess

import pytest

from test_catalogue import catalogue
from conftest import ROOT, needs

PAGES = sorted((ROOT / "packaging" / "man").glob("*.[0-9]"))


def said(words, **env):
    done = subprocess.run(words, env={"PATH": "/usr/bin:/bin", "LC_ALL": "C.UTF-8", **env}, stdin=subprocess.DEVNULL,
                          stdout=subprocess.PIPE, stderr=subprocess.PIPE, text=True)
    return done


def mandoc(page):
    """Every complaint, down to matters of style."""
    return said([needs("mandoc", "mandoc"), "-T", "lint", "-W", "style", str(page)]).stdout


def warnings(page):
    return said([needs("man", "man-db"), "--warnings", "-l", "-Tutf8", "-Z", str(page)], MANROFFSEQ="").stderr


def test_the_pages_are_there():
    assert [page.name for page in PAGES] == ["velmora-kiosk.7", "velmora-messages.7", "velmora.1", "velmora.properties.5"]


@pytest.mark.parametrize("page", PAGES, ids=lambda page: page.name)
def test_a_page_is_clean(page):
    assert mandoc(page) == ""
    assert warnings(page) == ""


def test_a_broken_page_is_seen(tmp_path):
    page = tmp_path / "velmora.1"
    page.write_text((ROOT / "packaging" / "man" / "velmora.1").read_text()
                    .replace(".SH FILES", ".SX FILES\n.ft QQ").replace("It prints nothing.\n", "It prints nothing. \n"))
    assert "unknown macro" in mandoc(page) and "whitespace at end" in mandoc(page)
    assert warnings(page) != ""


def test_a_page_refers_to_pages_that_exist():
    names = {page.name for page in PAGES}
    for page in PAGES:
        referred = re.findall(r"velmora[\w.\\-]* ?\(\d\)", page.read_text().replace("\\-", "-"))
        assert referred
        for name, section in re.findall(r"(velmora[\w.-]*) ?\((\d)\)", " ".join(referred)):
            assert "%s.%s" % (name, section) in names, page.name


@pytest.mark.parametrize("page, kind, field", [
    ("velmora.1", "option", "word"), ("velmora.1", "written", "word"), ("velmora.1", "variable", "name"),
    ("velmora.properties.5", "property", "key"), ("velmora-messages.7", "message", "text")])
def test_a_reader_finds_every_entry(page, kind, field):
    """As it is shown, since a formatter may swallow characters."""
    needs("man", "man-db")
    shown = said(["man", "-l", "-E", "UTF-8", str(ROOT / "packaging" / "man" / page)], MANWIDTH="400").stdout
    assert shown
    text = re.sub(r"\s+", " ", shown)
    for entry in catalogue.Catalogue(ROOT)[kind]:
        for line in entry[field].strip("\n").split("\n"):
            assert re.sub(r"\s+", " ", line.strip()) in text, line
