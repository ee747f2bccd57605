"""Shared-class caches: one inside the workspace is cleared after a dirty shutdown, one of an old level is emptied."""

import os

import pytest

from contents import contents
from world import APP, BASE, LOG, WORKSPACE, lines, read

CACHE = WORKSPACE + "/cache"
SID = WORKSPACE + "/.sid"
ENABLED = "vmarg.CacheMaintenance.enable=true"
FILES = ["app", "app1", "myapp.cache", "APP", "ap", "other"]


def cache(world, folder=CACHE, files=FILES):
    for name in files:
        world.write(folder + "/" + name, name)
    world.write(folder + "/app-folder/app", "below")


def kept(folder=CACHE):
    """What is left of the files, without those below."""
    found = contents(folder)
    assert found.pop("app-folder/", "gone") is None
    assert found.pop("app-folder/app", "gone") == "below"
    return list(found)


def install(world, share, *more):
    world.install()
    world.base_properties(*([] if share is None else ["vmarg.Dshare=" + share]), *more)


def after_a_dirty_shutdown(world, share, *more, folder=CACHE, words=()):
    """The files that are left after a start that finds the marker of an unclean end."""
    install(world, share, *more)
    cache(world, folder)
    world.write(SID)
    assert world.run(*words).status == 0
    world.only_platform()
    assert not os.path.exists(SID)
    assert read(WORKSPACE + "/logs/shutdown.log").count("Started ") == 1
    return kept(folder)


ALL = sorted(FILES)
INSIDE = "controlDir=${workspace.location}/cache"


@pytest.mark.parametrize("value", ["true", "false", "", "no"])
def test_only_the_presence_of_the_switch_counts(world, value):
    """With the value false it still enables maintenance."""
    assert after_a_dirty_shutdown(world, "-Xshareclasses:name=app," + INSIDE,
                                  "vmarg.CacheMaintenance.enable=" + value) == ["APP", "ap", "other"]


def test_without_the_switch_nothing_is_removed(world):
    """The marker goes all the same."""
    assert after_a_dirty_shutdown(world, "-Xshareclasses:name=app," + INSIDE,
                                  "vmarg.CacheMaintenance.enabled=true") == ALL


def test_after_a_clean_shutdown_nothing_is_removed(world):
    """The shutdown log is updated all the same."""
    install(world, "-Xshareclasses:name=app," + INSIDE, ENABLED)
    cache(world)
    assert world.run().status == 0
    assert kept() == ALL
    assert read(WORKSPACE + "/logs/shutdown.log").count("Started ") == 1


def test_only_the_start_after_a_dirty_shutdown_clears(world):
    """The marker is gone with it."""
    install(world, "-Xshareclasses:name=app," + INSIDE, ENABLED)
    cache(world)
    world.write(SID)
    world.run("-velmoraWait")
    assert kept() == ["APP", "ap", "other"]
    cache(world)
    world.run("-velmoraWait")
    assert kept() == ALL


def test_a_daemon_process_neither_clears_nor_takes_the_marker(world):
    """Nor is a shutdown dirty for it."""
    install(world, "-Xshareclasses:name=app," + INSIDE, ENABLED)
    world.plan("wait")
    world.run()
    world.platform()
    cache(world)
    world.write(SID)
    world.run()
    assert "-useDaemon" in world.platform(1).argv
    assert os.path.exists(SID)
    assert kept() == ALL


# ---- the name

def test_a_name_with_a_substitution_is_cut_to_its_beginning(world):
    """"app%u" stands for every file whose name holds "app"."""
    assert after_a_dirty_shutdown(world, "-Xshareclasses:name=app%u," + INSIDE, ENABLED) == ["APP", "ap", "other"]


@pytest.mark.parametrize("share, left", [
    ("-Xshareclasses:name=app1%%u%g," + INSIDE, ["APP", "ap", "app", "myapp.cache", "other"]),
    ("-Xshareclasses:" + INSIDE + ",name=myapp", ["APP", "ap", "app", "app1", "other"]),
    ("-Xshareclasses:name=  app  ,controlDir=  ${workspace.location}/cache  ", ["APP", "ap", "other"]),
    ("-Xshareclasses:name=a=p," + INSIDE, ALL),
    ("-Xshareclasses:cachename=other," + INSIDE, ["APP", "ap", "app", "app1", "myapp.cache"]),
    ("-Xshareclasses:nonames,x=other," + INSIDE, ["APP", "ap", "app", "app1", "myapp.cache"]),
    ("-Xshareclasses:name=app,name=other," + INSIDE, ["APP", "ap", "other"]),
    ("-Xshareclasses:Name=app," + INSIDE, ALL),
    ("other," + INSIDE + ",name", ["APP", "ap", "app", "app1", "myapp.cache"]),
])
def test_how_the_name_is_found(world, share, left):
    """The first "name" anywhere, also within a longer word; the value follows the first equals sign behind it, or
    begins with the whole text when there is none; blanks around it do not count."""
    assert after_a_dirty_shutdown(world, share, ENABLED) == left


@pytest.mark.parametrize("share", ["-Xshareclasses:name=%u," + INSIDE, "-Xshareclasses:name=," + INSIDE])
def test_an_empty_name_is_contained_in_every_name(world, share):
    """All files go, the folders stay."""
    assert after_a_dirty_shutdown(world, share, ENABLED) == []


def test_a_name_of_an_asterisk_means_everything(world):
    """The folders too."""
    install(world, "-Xshareclasses:name=*," + INSIDE, ENABLED)
    cache(world)
    world.write(SID)
    world.run()
    assert contents(CACHE) == {}


def test_an_asterisk_with_more_is_a_name(world):
    assert after_a_dirty_shutdown(world, "-Xshareclasses:name=app*," + INSIDE, ENABLED) == ALL


# ---- the folder

@pytest.mark.parametrize("share", [
    None, "", "-Xshareclasses", "-Xshareclasses:name=app", "-Xshareclasses:" + INSIDE,
    "-Xshareclasses:name=app,controldir=${workspace.location}/cache",
])
def test_without_a_name_or_a_folder_nothing_is_removed(world, share):
    assert after_a_dirty_shutdown(world, share, ENABLED) == ALL


def test_a_cache_outside_of_the_workspace_is_left_alone(world):
    """Others may share it."""
    assert after_a_dirty_shutdown(world, "-Xshareclasses:name=app,controlDir=/tmp/cache", ENABLED,
                                  folder="/tmp/cache") == ALL


@pytest.mark.parametrize("folder, removed", [
    (WORKSPACE, True), (WORKSPACE + "/", True), (WORKSPACE + "-of-others", True), ("/mnt/home/VANTOR", False),
    ("/mnt/./home/VANTOR/RCP/abc/anna/cache", False)])
def test_the_test_for_the_workspace_looks_at_the_text_alone(world, folder, removed):
    """What begins like it is inside, a neighbour too; another spelling of the same place is outside."""
    left = after_a_dirty_shutdown(world, "-Xshareclasses:name=app,controlDir=" + folder, ENABLED, folder=folder)
    assert not [name for name in ("app", "app1", "myapp.cache") if (name in left) == removed]
    assert {"APP", "ap", "other"} <= set(left)


def test_the_separators_of_the_folder_are_turned(world):
    """Behind the workspace; the value has kept them."""
    assert after_a_dirty_shutdown(world, "-Xshareclasses:name=app,controlDir=${workspace.location}\\\\cache",
                                  ENABLED) == ["APP", "ap", "other"]


def test_the_lines_own_options_go_first(world):
    assert after_a_dirty_shutdown(
        world, "-Xshareclasses:name=app," + INSIDE, ENABLED,
        words=["vmarg.Dshare=-Xshareclasses:name=other," + INSIDE]) == ["APP", "ap", "app", "app1", "myapp.cache"]


def test_a_folder_that_is_not_there_is_no_trouble(world):
    install(world, "-Xshareclasses:name=app," + INSIDE, ENABLED)
    world.write(SID)
    assert world.run().status == 0
    world.only_platform()
    assert "cache" not in read(LOG).split("QVMRL0132I")[0]


def test_files_that_cannot_be_removed_are_no_trouble(world):
    """Nothing is said."""
    install(world, "-Xshareclasses:name=app," + INSIDE, ENABLED)
    cache(world)
    os.chmod(CACHE, 0o555)
    world.write(SID)
    assert world.run().status == 0
    world.only_platform()
    os.chmod(CACHE, 0o755)
    assert kept() == ALL
    assert "cache" not in read(LOG).split("QVMRL0132I")[0]


def test_links_are_removed_and_never_followed(world):
    """A link to a folder counts as a folder, and is left alone."""
    install(world, "-Xshareclasses:name=app," + INSIDE, ENABLED)
    world.write("/mnt/elsewhere/app", "precious")
    world.link(CACHE + "/app-file", "/mnt/elsewhere/app")
    world.link(CACHE + "/app-folder", "/mnt/elsewhere")
    world.write(SID)
    assert world.run().status == 0
    assert contents(CACHE) == {"app-folder": "-> /mnt/elsewhere"}
    assert contents("/mnt/elsewhere") == {"app": "precious"}


# ---- the shared classes of an old level

CLASSES = "/mnt/classes"
PATH = "jvm.shareclasses.fullpath=" + CLASSES


def levels(world, user, launcher, *more):
    """An area whose user has one level, an installation with another."""
    world.install("user", *([] if launcher is None else ["provisioning.manifest.version=" + launcher]))
    world.base_properties(*([] if user is None else ["provisioning.manifest.version=" + user]), *more)
    world.write(CLASSES + "/a/b", "x")
    world.write(CLASSES + "/c", "x")


@pytest.mark.parametrize("user, launcher", [
    ("1", "2"), ("2", "1"), (None, "1"), (None, None), ("1", "1 2"), ("1", None)])
def test_a_new_level_empties_the_shared_classes(world, user, launcher):
    """Also with a level that is missing on one side; the folder itself stays."""
    levels(world, user, launcher, PATH)
    assert world.run().status == 0
    assert contents(CLASSES) == {}
    assert "QVMRL008" not in read(LOG)


def test_an_equal_level_keeps_the_shared_classes(world):
    levels(world, "1", "1", PATH)
    before = contents(CLASSES)
    world.run()
    assert contents(CLASSES) == before == {"a/": None, "a/b": "x", "c": "x"}


def test_a_daemon_process_empties_them_too(world):
    levels(world, "1", "2", PATH)
    world.plan("wait")
    world.run()
    world.platform()
    world.write(CLASSES + "/again")
    world.run()
    assert "-useDaemon" in world.platform(1).argv
    assert contents(CLASSES) == {}


def test_the_separators_and_placeholders_of_their_path(world):
    levels(world, "1", "2", "jvm.shareclasses.fullpath=${rcp.home}\\\\..\\\\classes")
    assert world.run().status == 0
    assert contents(CLASSES) == {}


@pytest.mark.parametrize("more", [[], ["jvm.shareclasses.fullpath=/mnt/nowhere"]])
def test_without_their_path_or_with_one_that_leads_nowhere_there_is_no_removal(world, more):
    """And no message."""
    levels(world, "1", "2", *more)
    assert world.run().status == 0
    assert contents(CLASSES) == {"a/": None, "a/b": "x", "c": "x"}
    assert "QVMRL008" not in read(LOG)


def test_shared_classes_that_cannot_be_removed_are_told_and_the_start_goes_on(world):
    """All of it in one message, without a reason of its own."""
    levels(world, "1", "2", PATH)
    os.unlink(CLASSES + "/c")
    os.chmod(CLASSES + "/a", 0o555)
    assert world.run().status == 0
    world.only_platform()
    assert lines(
        "",
        "QVMRL0086I begin: Information collected while removing shared classes directory",
        "Can't delete file /mnt/classes/a/b  -  Failed with error 13: Permission denied",
        "Can't delete dir /mnt/classes/a  -  Failed with error 39: Directory not empty",
        "",
        "QVMRL0087I end: Unable to remove all files in the shared classes directory.") in read(LOG)
    assert contents(CLASSES) == {"a/": None, "a/b": "x"}


def test_a_file_in_the_place_of_the_shared_classes(world):
    """It is told, and stays."""
    world.install("user", "provisioning.manifest.version=2")
    world.base_properties("jvm.shareclasses.fullpath=" + BASE + "/config.ini")
    assert world.run().status == 0
    assert lines(
        "QVMRL0086I begin: Information collected while removing shared classes directory",
        "Error in /mnt/app/base/config.ini  -  Failed with error 20: Not a directory",
        "",
        "QVMRL0087I end: Unable to remove all files in the shared classes directory.") in read(LOG)
    assert os.path.exists(APP + "/base/config.ini")
