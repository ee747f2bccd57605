"""What goes into the packages, as far as it can be told without building one (tests/full/package.sh builds them)."""

import re
import subprocess

import pytest

from conftest import ROOT

LISTS = ROOT / "packaging" / "CMakeLists.txt"


def installed_documents():
    found = re.search(r"^set\(VELMORA_DOCUMENTS ([^)]*)\)", LISTS.read_text(), re.M)
    return [ROOT / name for name in found.group(1).split()]


def test_the_documents_are_there_and_lead_to_each_other_alone():
    """They lie in one folder where they are installed."""
    documents = installed_documents()
    names = {page.name for page in documents}
    assert {"administrators.md", "support.md", "platform.md", "messages.md"} <= names
    for page in documents:
        text = page.read_text()
        led_to = re.findall(r"\]\(([^)#:]+)\)", text) + re.findall(r"\b([\w-]+\.md)\b", text)
        assert set(led_to) <= names, page.name


def test_the_manual_names_documents_that_are_installed():
    names = {page.name for page in installed_documents()}
    named = set()
    for page in (ROOT / "packaging" / "man").glob("*.[157]"):
        named |= set(re.findall(r"([\w-]+\.md)\b", page.read_text().replace("\\-", "-")))
    assert named and named <= names


def configured(folder, *words):
    return subprocess.run(["cmake", "-S", ROOT, "-B", folder, "-DVELMORA_TESTS=OFF", *words], stdout=subprocess.PIPE,
                          stderr=subprocess.STDOUT, text=True)


def trailer(folder):
    return re.search(r"^ -- .*$", (folder / "packaging" / "changelog").read_text(), re.M).group()


def contact(folder):
    return re.search(r'^set\(CPACK_PACKAGE_CONTACT "(.*)"\)$', (folder / "CPackConfig.cmake").read_text(), re.M).group(1)


def test_whoever_gives_packages_away_is_named_in_them(tmp_path):
    done = configured(tmp_path)
    assert done.returncode == 0, done.stdout
    # The default is an address of nobody: example.org is kept free of any.
    assert contact(tmp_path) == "The velmora developers <velmora@users.noreply.example.org>"
    committed = (ROOT / "packaging" / "debian" / "changelog").read_text()
    assert (tmp_path / "packaging" / "changelog").read_text() == committed
    date = committed.splitlines()[-1].partition(">")[2]

    done = configured(tmp_path, "-DVELMORA_MAINTAINER=Anna Beta <anna@office.example>")
    assert done.returncode == 0, done.stdout
    assert contact(tmp_path) == "Anna Beta <anna@office.example>"
    assert trailer(tmp_path) == " -- Anna Beta <anna@office.example>" + date


@pytest.mark.parametrize("name", ["anna@office.example", "Anna <anna>", "<anna@office.example>", "Anna <a@b> <c@d>"])
def test_a_maintainer_who_could_not_be_written_to_is_refused(tmp_path, name):
    done = configured(tmp_path, "-DVELMORA_MAINTAINER=" + name)
    assert done.returncode != 0
    assert "VELMORA_MAINTAINER has to be NAME <ADDRESS>" in re.sub(r"\s+", " ", done.stdout)
