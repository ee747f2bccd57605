"""A user's area that another installation has made: the workspace stays, the configuration is made anew."""

import os
import pathlib
import re

import pytest

from contents import contents
from interruption import Interruptions
from world import HEAD, INSTALL_AREA, LAUNCHER, STARTUP, areas, lines, read, system, user_logs

WORKSPACE = "/mnt/ws"
CONFIG = WORKSPACE + "/.config"
UPDATE = CONFIG + "/org.eclipse.update"
BACKUP = WORKSPACE + "/.configbak"
# Read here, since a world may hide the place where it lies.
PAGE = (pathlib.Path(__file__).resolve().parents[2] / "docs" / "interrupted-resets.md").read_text(encoding="utf-8")

REGISTRY = "the registry\n" + "r" * 40 + "\n"
BOOKMARKS = "<bookmarks/>\n"


def install(world, install_id, *base):
    """An installation whose workspace does not depend on its id."""
    world.install()
    world.properties("rcp.install.id=" + install_id, "rcp.base.location=${rcp.home}/base", "install.configuration=user",
                     "rcp.data=" + WORKSPACE)
    world.base_properties(*base)


def copies(install_id, *words, base=()):
    """What a start makes in a new configuration."""
    words = [LAUNCHER, *words]
    return {
        "args.properties": lines(*("arg%d=%s" % pair for pair in enumerate(words)), "argc=%d" % len(words),
                                 "com.vantor.rcp.core.internal.librarypath="),
        "config.ini": "osgi.bundles=a, b\n",
        "org.eclipse.update/": None,
        "org.eclipse.update/platform.xml": "<config>\n</config>\n",
        "rcpinstall.properties": lines(*base, "rcp.install.id=" + install_id, "rcp.base.location=${rcp.home}/base",
                                       "install.configuration=user"),
    }


def old_area(world, *, update=True, base=()):
    """An area of the installation "old", with what a user and a platform have put there. Returns its configuration."""
    install(world, "old", *base)
    assert world.run("-velmoraWait", "-old").status == 0
    world.write(CONFIG + "/mine.prefs", "mine\n")
    world.write(CONFIG + "/deep/er/file", "deep\n")
    world.write(UPDATE + "/platform.xml", "<mine/>\n")
    if update:
        world.write(UPDATE + "/registry", REGISTRY)
        world.write(UPDATE + "/bookmarks.xml", BOOKMARKS)
    world.write(WORKSPACE + "/.metadata/.plugins/org.example/state", "state\n")
    world.write(WORKSPACE + "/document", "document\n")
    return contents(CONFIG)


def workspace():
    """Everything in the workspace but the logs and the control files."""
    found = contents(WORKSPACE)
    return {name: what for name, what in found.items()
            if not name.startswith(("logs/", ".rcp.", "applications/"))}


def below(folder, found):
    """These contents as those of a folder in the workspace."""
    return {folder + "/": None, **{folder + "/" + name: what for name, what in found.items()}}


KEPT = {
    ".metadata/": None, ".metadata/.plugins/": None, ".metadata/.plugins/org.example/": None,
    ".metadata/.plugins/org.example/state": "state\n", "document": "document\n",
}
CARRIED = {"org.eclipse.update/registry": REGISTRY, "org.eclipse.update/bookmarks.xml": BOOKMARKS}


def renewed(old, *words, carried=CARRIED, record={"platform.xml.old": "<mine/>\n"}, more={}):
    """The whole workspace after a start of the installation "new"."""
    return {**KEPT, **below(".config", {**copies("new", *words), **carried}), **below(".configbak", old), **record,
            **more}


def command(*words):
    argv = HEAD + list(words) + areas(WORKSPACE) + STARTUP + system(WORKSPACE) + INSTALL_AREA
    return [word.replace("install.id=abc", "install.id=new") for word in argv]


# ---- the whole story

def test_a_workspace_is_carried_over_to_a_new_installation(world):
    """The old configuration is the backup; registry and bookmarks are in the new one, and a record of the update
    configuration is in the workspace. Nothing else is touched."""
    old = old_area(world)
    install(world, "new")
    assert world.run("-velmoraWait", "-foo").status == 0
    assert workspace() == renewed(old, "-velmoraWait", "-foo")
    assert world.platforms()[1].argv == command("-velmoraWait", "-foo")


def test_an_older_backup_and_leftovers_in_the_way(world):
    """The leftover is removed; the older backup is moved aside, to the lowest name that is free, and removed there."""
    old = old_area(world)
    world.write(BACKUP + "/older", "older\n")
    world.write(BACKUP + "deleteme0003/nested/leftover", "leftover\n")
    world.write(WORKSPACE + "/registry.old", "stale\n")
    world.write(WORKSPACE + "/bookmarks.xml.old/stale", "a folder\n")
    world.write(WORKSPACE + "/platform.xml.old", "stale\n")
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old)


def test_the_next_start_finds_nothing_to_carry_over(world):
    old = old_area(world)
    install(world, "new")
    world.run("-velmoraWait")
    world.run("-velmoraWait", "-again")
    assert workspace() == renewed(old, "-velmoraWait", "-again")


def test_only_the_latest_backup_is_kept(world):
    old_area(world)
    install(world, "new")
    world.run("-velmoraWait")
    world.write(CONFIG + "/newer.prefs", "newer\n")
    middle = contents(CONFIG)
    install(world, "newest")
    world.run("-velmoraWait")
    found = workspace()
    assert {name: what for name, what in found.items() if name.startswith(".configbak")} == below(".configbak", middle)
    assert found["platform.xml.old"] == "<config>\n</config>\n"
    assert read(UPDATE + "/registry") == REGISTRY


def test_without_registry_and_bookmarks(world):
    """The configuration is moved away all the same, and each missing file is noted each time it is looked for."""
    old = old_area(world, update=False)
    install(world, "new")
    assert world.run("-debug").status == 0
    assert workspace() == renewed(old, "-debug", carried={})
    (traced,) = [path for path in user_logs() if "velmora_" in path]
    assert [line for line in read(traced).splitlines() if line.startswith("QVMRL0110I")] == [
        "QVMRL0110I: '/mnt/ws/.config/org.eclipse.update/registry' not found",
        "QVMRL0110I: '/mnt/ws/.config/org.eclipse.update/bookmarks.xml' not found",
        "QVMRL0110I: '/mnt/ws/registry.old' not found",
        "QVMRL0110I: '/mnt/ws/bookmarks.xml.old' not found"]


def test_without_anything_of_the_update_manager(world):
    old = old_area(world, update=False)
    os.unlink(UPDATE + "/platform.xml")
    del old["org.eclipse.update/platform.xml"]
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old, carried={}, record={})


def test_stale_copies_become_the_new_files_when_there_are_no_others(world):
    """What is in the workspace under their names is moved, whoever left it."""
    old = old_area(world, update=False)
    world.write(WORKSPACE + "/registry.old", "stale\n")
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old, carried={"org.eclipse.update/registry": "stale\n"})


# ---- when

@pytest.mark.parametrize("properties", ["", "rcp.install.id=\n", "other=1\n", "rcp.install.id=new\n",
                                        "rcp.install.id= new \n"])
def test_an_area_that_does_not_name_another_installation(world, properties):
    """Without an id, with an empty one or with an equal one it is not old."""
    old_area(world)
    install(world, "new")
    world.write(CONFIG + "/rcpinstall.properties", properties + "rcp.base.location=/mnt/app/base\n")
    world.run()
    assert read(CONFIG + "/mine.prefs") == "mine\n"
    assert not os.path.exists(BACKUP)


def test_an_area_whose_properties_are_gone_is_not_old(world):
    old_area(world)
    install(world, "new")
    os.unlink(CONFIG + "/rcpinstall.properties")
    assert world.run().status == 0
    assert read(CONFIG + "/mine.prefs") == "mine\n"


@pytest.mark.parametrize("missing", ["logs", ".config"])
def test_an_area_of_which_a_folder_is_missing_is_not_looked_at(world, missing):
    """Something had to be made, so the start is a first one."""
    old_area(world)
    install(world, "new")
    os.rename(WORKSPACE + "/" + missing, "/mnt/moved")
    assert world.run().status == 0
    assert not os.path.exists(BACKUP)


def test_missing_extension_folders_do_not_keep_it_back(world):
    """They are made afterwards."""
    old = old_area(world)
    os.rename(WORKSPACE + "/applications", "/mnt/moved")
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old)


def test_a_requested_reset_counts_for_nothing_then(world):
    """No plug-in state is removed."""
    old = old_area(world, base=["resetDir.a=org.example"])
    install(world, "new")
    world.run("-resetconfig")
    assert workspace() == renewed(old)


# ---- names in the way

def leftover(world, number):
    return world.write(BACKUP + "deleteme%04d/nested/leftover" % number, "leftover\n")


@pytest.mark.parametrize("numbers", [[], [1], [5], [1, 2, 3, 4, 5], [2, 4], [1, 3, 5], [6]])
def test_leftovers_in_every_state(world, numbers):
    """Those from 1 to 5 are removed; a sixth is none."""
    old = old_area(world)
    world.write(BACKUP + "/older", "older\n")
    for number in numbers:
        leftover(world, number)
    install(world, "new")
    assert world.run().status == 0
    sixth = {".configbakdeleteme0006/": None, ".configbakdeleteme0006/nested/": None,
             ".configbakdeleteme0006/nested/leftover": "leftover\n"} if 6 in numbers else {}
    assert workspace() == renewed(old, more=sixth)


def test_leftovers_stay_when_nothing_is_in_the_way(world):
    """Only a directory in the place of the backup makes room for itself."""
    old = old_area(world)
    leftover(world, 1)
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old, more={
        ".configbakdeleteme0001/": None, ".configbakdeleteme0001/nested/": None,
        ".configbakdeleteme0001/nested/leftover": "leftover\n"})


def stubborn(world, *numbers):
    """Leftovers that cannot be removed."""
    for number in numbers:
        leftover(world, number)
        os.chmod(BACKUP + "deleteme%04d/nested" % number, 0o555)


def stubborn_contents(number):
    name = ".configbakdeleteme%04d/" % number
    return {name: None, name + "nested/": None, name + "nested/leftover": "leftover\n"}


def test_a_leftover_that_cannot_be_removed_is_passed_over(world):
    """The lowest free name is taken. Nothing is said."""
    old = old_area(world)
    world.write(BACKUP + "/older", "older\n")
    stubborn(world, 1, 2, 4)
    leftover(world, 3)
    install(world, "new")
    # The third was there when it was looked at, so the free one is the fifth.
    trace = ["-e", "trace=rename", "-y"]
    assert world.run(strace=trace).status == 0
    assert 'rename("/mnt/ws/.configbak", "/mnt/ws/.configbakdeleteme0005") = 0' in read("/dev/shm/strace")
    assert workspace() == renewed(old, more={**stubborn_contents(1), **stubborn_contents(2), **stubborn_contents(4)})


def test_when_no_name_is_free_the_start_ends(world):
    """The first is tried, and the older backup stays."""
    old_area(world)
    world.write(BACKUP + "/older", "older\n")
    stubborn(world, 1, 2, 3, 4, 5)
    install(world, "new")
    before = workspace()
    failed(world, "QVMRL0112E: Can't move file/dir  '/mnt/ws/.configbak'", "Directory not empty")
    assert workspace() == {**before, "platform.xml.old": "<mine/>\n", "registry.old": REGISTRY,
                           "bookmarks.xml.old": BOOKMARKS}


def test_links_that_lead_back_do_not_hold_a_start(world):
    """A folder behind a link is emptied, in forty levels of it. Two such links would be followed for days."""
    old = old_area(world)
    world.write(BACKUP + "/older", "older\n")
    for name in ("one", "other"):
        os.symlink(".", BACKUP + "/" + name)
    install(world, "new")
    assert world.run().status == 0
    aside = {".configbakdeleteme0001/": None, ".configbakdeleteme0001/one": "-> .",
             ".configbakdeleteme0001/other": "-> ."}
    assert workspace() == renewed(old, more=aside)


def test_a_backup_that_cannot_be_removed_stays_aside(world):
    """Silently; the next one that is in the way clears it, when it can be."""
    old = old_area(world)
    world.write(BACKUP + "/nested/older", "older\n")
    os.chmod(BACKUP + "/nested", 0o555)
    install(world, "new")
    assert world.run("-velmoraWait").status == 0
    aside = {".configbakdeleteme0001/": None, ".configbakdeleteme0001/nested/": None,
             ".configbakdeleteme0001/nested/older": "older\n"}
    assert workspace() == renewed(old, "-velmoraWait", more=aside)
    os.chmod(BACKUP + "deleteme0001/nested", 0o755)
    install(world, "newer")
    assert world.run("-velmoraWait").status == 0
    assert [name for name in workspace() if "deleteme" in name] == []


def test_a_file_in_the_place_of_the_backup_is_deleted(world):
    old = old_area(world)
    world.write(BACKUP, "a file\n")
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old)


def test_a_link_in_the_place_of_the_backup_is_deleted_and_not_followed(world):
    """A link to a folder is none."""
    old = old_area(world)
    world.write("/mnt/elsewhere/precious", "precious\n")
    world.link(BACKUP, "/mnt/elsewhere")
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old)
    assert contents("/mnt/elsewhere") == {"precious": "precious\n"}


# ---- bad input

def failed(world, message, reason):
    """A start that ends with this as its last line, and starts nothing."""
    before = len(world.platforms())
    assert world.run().status == 255
    assert read(WORKSPACE + "/logs/velmora.log").splitlines()[-1] == "%s : %s" % (message, reason)
    assert len(world.platforms()) == before


def test_a_registry_that_is_a_folder_cannot_be_carried_over(world):
    """Its copy ends the start, each time; nothing has been moved by then."""
    old = old_area(world, update=False)
    world.write(UPDATE + "/registry/entry", "entry\n")
    install(world, "new")
    for _ in range(2):
        failed(world, "QVMRL0193E: Did not encounter EOF while copying file contents", "Is a directory")
    assert contents(CONFIG) == {**old, "org.eclipse.update/registry/": None,
                                "org.eclipse.update/registry/entry": "entry\n"}
    assert not os.path.exists(BACKUP)


def test_a_registry_that_cannot_be_read_counts_as_missing(world):
    """It stays in the backup."""
    old = old_area(world)
    os.chmod(UPDATE + "/registry", 0)
    install(world, "new")
    assert world.run().status == 0
    assert workspace() == renewed(old, carried={"org.eclipse.update/bookmarks.xml": BOOKMARKS})


def test_a_configuration_that_cannot_be_read_cannot_be_moved(world):
    """It counts as missing, and it must be there."""
    old = old_area(world, update=False)
    install(world, "new")
    os.chmod(CONFIG, 0o300)
    failed(world, "QVMRL0109E: Unable to locate '/mnt/ws/.config' for copying", "Permission denied")
    os.chmod(CONFIG, 0o755)
    assert contents(CONFIG) == old


@pytest.mark.parametrize("there, message", [
    (["platform.xml.old"], "QVMRL0111E: Can't delete old copy of file '/mnt/ws/platform.xml.old'"),
    ([], "QVMRL0191E: Unable to open destination file /mnt/ws/platform.xml.old to be copied to"),
])
def test_a_workspace_that_may_not_be_written_to(world, there, message):
    old = old_area(world)
    for name in there:
        world.write(WORKSPACE + "/" + name, "earlier\n")
    install(world, "new")
    os.chmod(WORKSPACE, 0o555)
    failed(world, message, "Permission denied")
    assert contents(CONFIG) == old


@pytest.mark.parametrize("backup, message", [
    (False, "QVMRL0141E: Can't move file/dir  '/mnt/ws/.config'"),
    (True, "QVMRL0112E: Can't move file/dir  '/mnt/ws/.configbak'"),
])
def test_a_configuration_that_cannot_be_renamed(world, backup, message):
    old = old_area(world, update=False)
    os.unlink(UPDATE + "/platform.xml")
    del old["org.eclipse.update/platform.xml"]
    if backup:
        world.write(BACKUP + "/older", "older\n")
    install(world, "new")
    os.chmod(WORKSPACE, 0o555)
    failed(world, message, "Permission denied")
    assert contents(CONFIG) == old
    assert os.path.exists(BACKUP + "/older") == backup


def test_a_new_configuration_that_cannot_be_made(world):
    """The old one is the backup by then, and the copies are in the workspace; a later start goes on from there."""
    old = old_area(world)
    install(world, "new")
    before = len(world.platforms())
    start = world.run(strace=["-e", "trace=mkdir", "-P", UPDATE, "-e", "inject=mkdir:error=ENOSPC"])
    assert start.status == 255 and len(world.platforms()) == before
    assert read(WORKSPACE + "/logs/velmora.log").splitlines()[-1] == (
        "QVMRL0044E: Unable to create %s directory. : No space left on device" % UPDATE)
    assert contents(BACKUP) == old
    assert (read(WORKSPACE + "/registry.old"), read(WORKSPACE + "/bookmarks.xml.old")) == (REGISTRY, BOOKMARKS)
    assert world.run().status == 0
    assert {name: what for name, what in contents(CONFIG).items()} == copies("new")


def test_a_full_disk_while_the_registry_is_copied(world):
    """The start ends before anything is moved; the user's registry is where it was."""
    old = old_area(world)
    install(world, "new")
    world.small_disk("/mnt/small", 4096)
    world.write("/mnt/small/filler", "x" * 4096)
    world.link(WORKSPACE + "/registry.old", "/mnt/small/nowhere")
    failed(world, "QVMRL0192E: Encountered error copying file contents", "No space left on device")
    assert contents(CONFIG) == old


# ---- launchers that are killed

def documented_leftovers():
    """The names in the first column of the page's tables."""
    cells = re.findall(r"^\|([^|]+)\|", PAGE, re.M)
    return {name for cell in cells for name in re.findall(r"`([^`]+)`", cell)}


def leftovers(found):
    """What lies in the workspace that an undisturbed start does not leave, by the names of the page."""
    names = {name.split("/")[0] for name in found}
    extra = names - {".config", ".configbak", ".metadata", "document", "platform.xml.old"}
    return {re.sub(r"deleteme000[1-5]$", "deleteme000N", name) for name in extra}


@pytest.mark.within(300)
def test_a_launcher_killed_at_any_step(world):
    """The next start works. The configuration is whole and new, the backup is the old one; registry and bookmarks
    have been carried over, or lie in the workspace for good, whole. What else may be left is on a page of the
    documentation."""
    old = old_area(world)
    world.write(BACKUP + "/older", "older\n")
    leftover(world, 2)
    install(world, "new")
    left, in_place, steps = set(), set(), 0
    for step in Interruptions(world, WORKSPACE, "-velmoraWait"):
        before = len(world.platforms())
        start = world.run("-velmoraWait", "-next")
        assert start.status == 0, step
        assert world.platforms()[before].argv == command("-velmoraWait", "-next"), step
        found = workspace()
        assert {name: what for name, what in found.items() if name.startswith(".configbak/")} == {
            ".configbak/" + name: what for name, what in old.items()} | {".configbak/": None}, step
        config = contents(CONFIG)
        carried = [config.pop("org.eclipse.update/" + name, found.get(name + ".old"))
                   for name in ("registry", "bookmarks.xml")]
        assert carried == [REGISTRY, BOOKMARKS], step
        assert config == copies("new", "-velmoraWait", "-next"), step
        assert found["platform.xml.old"] == "<mine/>\n" and KEPT.items() <= found.items(), step
        left |= leftovers(found)
        in_place.add(os.path.exists(UPDATE + "/registry"))
        steps += 1
    assert steps > 20
    assert in_place == {True, False}
    assert left == {"registry.old", "bookmarks.xml.old", ".configbakdeleteme000N"}
    assert left <= documented_leftovers()
