""""-resetconfig": the configuration is made anew, and the plug-in state that the installation names is deleted."""

import os

import pytest

from contents import contents
from interruption import Interruptions
from test_reuse import (BACKUP, BOOKMARKS, CARRIED, CONFIG, REGISTRY, UPDATE, WORKSPACE, below, copies,
                        documented_leftovers, install, leftovers, old_area, workspace)
from world import BASE, HEAD, INSTALL_AREA, STARTUP, areas, lines, read, system, user_logs

PLUGINS = WORKSPACE + "/.metadata/.plugins"
LOG = WORKSPACE + "/logs/velmora.log"
KEPT = {".metadata/": None, ".metadata/.plugins/": None, "document": "document\n"}
STATE = {".metadata/.plugins/org.example/": None, ".metadata/.plugins/org.example/state": "state\n"}


def area(world, *reset_lines, update=True):
    """An area of the installation "old", which stays; its properties name what a reset deletes."""
    return old_area(world, base=reset_lines, update=update)


def renewed(old, *words, base=(), carried=CARRIED, state=STATE, more={}):
    """The whole workspace after a reset."""
    return {**KEPT, **state, **below(".config", {**copies("old", *words, base=base), **carried}),
            **below(".configbak", old), **more}


def reset(world, *words):
    assert world.run("-resetconfig", *words).status == 0


def command(*words):
    argv = HEAD + list(words) + areas(WORKSPACE) + STARTUP + system(WORKSPACE) + INSTALL_AREA
    return [word.replace("install.id=abc", "install.id=old") for word in argv]


# ---- the whole story

def test_a_reset(world):
    """The old configuration is the backup; registry and bookmarks are in the new one. The named plug-in state is
    gone, other state and the user's own files are not; no record of the update configuration is made. The word
    reaches neither the platform nor its record."""
    old = area(world, "resetDir.a=org.example")
    world.write(PLUGINS + "/org.other/state", "other\n")
    reset(world, "-foo")
    assert workspace() == renewed(old, "-foo", base=["resetDir.a=org.example"], state={
        ".metadata/.plugins/org.other/": None, ".metadata/.plugins/org.other/state": "other\n"})
    assert world.platforms()[1].argv == command("-foo")


def test_a_daemon_process_resets_too(world):
    """While the main platform runs; what only the main process makes is missing from the new configuration."""
    area(world, "resetDir.a=org.example")
    world.plan("wait", start=1)
    world.run()
    main = world.platform(1)
    old = contents(CONFIG)
    reset(world, "-foo")
    expected = renewed(old, base=["resetDir.a=org.example"], state={})
    del expected[".config/args.properties"]
    assert workspace() == expected
    argv = command("-foo")
    at = argv.index("-startup")
    assert world.platform(2).argv == argv[:at] + ["-useDaemon", str(main.pid)] + argv[at:]
    assert main.alive()


def test_the_reset_of_a_service(world):
    """Its configuration lies beside its workspace, and so does the backup; the plug-in state is in the workspace, and
    registry and bookmarks come back into the configuration. The word for another workspace has no effect."""
    world.install("service", "jvm.location=/mnt/jvm/bin/java")
    world.base_properties("resetDir.a=org.example")
    world.stand_in("/mnt/jvm/bin/java")
    top = "/mnt/app/eclipse"
    world.folder(top, 0o777)
    assert world.run().status == 0
    world.write(top + "/.config/mine.prefs", "mine\n")
    world.write(top + "/.config/org.eclipse.update/registry", REGISTRY)
    world.write(top + "/.config/org.eclipse.update/bookmarks.xml", BOOKMARKS)
    world.write(top + "/.workspace/.metadata/.plugins/org.example/state", "state\n")
    old = contents(top + "/.config")
    assert world.run("-resetconfig", "-data", "/mnt/other").status == 0
    assert contents(top + "/.configbak") == old
    new = contents(top + "/.config")
    assert CARRIED.items() <= new.items() and "mine.prefs" not in new
    assert contents(top + "/.workspace/.metadata") == {".plugins/": None}
    assert sorted(os.listdir(top)) == [".config", ".configbak", ".workspace"]
    assert not os.path.exists("/mnt/other")


def test_a_start_without_the_word_resets_nothing(world):
    old = area(world, "resetDir.a=org.example")
    world.run("-Resetconfig")
    found = workspace()
    assert STATE.items() <= found.items()
    assert contents(CONFIG)["mine.prefs"] == old["mine.prefs"] and not os.path.exists(BACKUP)


def test_each_reset_keeps_only_the_configuration_before_it(world):
    area(world)
    reset(world, "-velmoraWait")
    world.write(CONFIG + "/newer.prefs", "newer\n")
    middle = contents(CONFIG)
    reset(world, "-velmoraWait")
    assert workspace() == renewed(middle, "-velmoraWait")


def test_an_older_backup_and_leftovers_in_the_way(world):
    old = area(world)
    world.write(BACKUP + "/older", "older\n")
    world.write(BACKUP + "deleteme0003/nested/leftover", "leftover\n")
    world.write(WORKSPACE + "/registry.old", "stale\n")
    world.write(WORKSPACE + "/bookmarks.xml.old/stale", "a folder\n")
    reset(world)
    assert workspace() == renewed(old)


def test_an_earlier_record_of_the_update_configuration_is_left_alone(world):
    old = area(world)
    world.write(WORKSPACE + "/platform.xml.old", "earlier\n")
    reset(world)
    assert workspace() == renewed(old, more={"platform.xml.old": "earlier\n"})


def test_without_registry_and_bookmarks(world):
    """Each is noted as missing each time it is looked for; the update configuration is not looked for."""
    old = area(world, update=False)
    reset(world, "-debug")
    assert workspace() == renewed(old, "-debug", carried={})
    (traced,) = [path for path in user_logs() if "velmora_" in path]
    assert [line for line in read(traced).splitlines() if line.startswith("QVMRL0110I")] == [
        "QVMRL0110I: '/mnt/ws/.config/org.eclipse.update/registry' not found",
        "QVMRL0110I: '/mnt/ws/.config/org.eclipse.update/bookmarks.xml' not found",
        "QVMRL0110I: '/mnt/ws/registry.old' not found",
        "QVMRL0110I: '/mnt/ws/bookmarks.xml.old' not found"]


# ---- when

def test_in_a_new_area_there_is_nothing_to_reset(world):
    install(world, "old")
    reset(world, "-foo")
    assert contents(CONFIG) == copies("old", "-foo")
    assert not os.path.exists(BACKUP)


@pytest.mark.parametrize("missing", ["logs", ".config"])
def test_an_area_of_which_a_folder_is_missing_is_not_reset(world, missing):
    """Something had to be made, so the start is a first one."""
    area(world, "resetDir.a=org.example")
    os.rename(WORKSPACE + "/" + missing, "/mnt/moved")
    reset(world)
    assert not os.path.exists(BACKUP) and STATE.items() <= workspace().items()


def test_a_reset_word_of_an_extension_resets_nothing(world):
    """Nor does it reach the platform."""
    area(world, "resetDir.a=org.example")
    properties = read("/mnt/app/rcp/velmora.properties")
    world.write("/mnt/app/rcp/velmora.properties", properties + "config.a.1=-resetconfig\nconfig.a.2=-x\n")
    assert world.run("-config", "a").status == 0
    assert not os.path.exists(BACKUP)
    assert world.platforms()[1].argv == command("-x")


def test_a_restart_with_a_reset(world):
    """The record of the words moves away with the rest, and none is written."""
    old = area(world)
    reset(world, "-restart")
    found = renewed(old)
    del found[".config/args.properties"]
    assert workspace() == found


# ---- the plug-in state

def after(world, *reset_lines, folders=("org.example",)):
    """The plug-in state that is left of these folders."""
    area(world, *reset_lines)
    for folder in folders:
        world.write(PLUGINS + "/" + folder + "/deep/state", "state\n")
    reset(world)
    found = contents(PLUGINS)
    return [folder for folder in folders if folder + "/deep/state" in found]


def test_nested_and_missing_state(world):
    """A value may name a folder within another; one that is not there is passed over silently."""
    assert after(world, "resetDir.a=a/b", "resetDir.b=no.such", "resetDir.c=c", "resetDir.d=d/no/such",
                 folders=["a", "a/b", "a/c", "c", "d"]) == ["a", "a/c", "d"]
    assert "no.such" not in read(LOG)


def test_every_key_of_the_group_counts(world):
    """Whatever follows the point, a number, nothing, the same name twice."""
    assert after(world, "resetDir.=a", "resetDir.x=b", "resetDir.x=c", "resetDir.x.linux=d", "resetdir.y=e",
                 "resetDirs.y=f", "resetDir=g", folders=list("abcdefg")) == ["e", "f", "g"]


def test_an_empty_value_is_passed_over(world):
    """It would name the whole area of the plug-ins."""
    assert after(world, "resetDir.a=", "resetDir.b=b", folders=["a", "b"]) == ["a"]


def test_separators_in_a_value_are_turned(world):
    assert after(world, "resetDir.a=a\\\\b", folders=["a/b", "a/c"]) == ["a/c"]


def test_placeholders_in_a_value_are_not_resolved(world):
    """The file is read as it stands. A placeholder that has no value would end the start later, though."""
    assert after(world, "name=a", "resetDir.a=${prop.name}", folders=["a", "${prop.name}"]) == ["a"]


def test_a_value_may_lead_out_of_the_plugins(world):
    """It is not checked for that; it removes what it names and no more."""
    area(world, "resetDir.a=../../private", "resetDir.b=org.example/../org.second")
    for folder in ("private/deep", "private2", ".metadata/.plugins/org.second"):
        world.write(WORKSPACE + "/" + folder + "/file", "x")
    reset(world)
    found = workspace()
    assert [name for name in found if name.startswith("private")] == ["private2/", "private2/file"]
    assert STATE.items() <= found.items() and ".metadata/.plugins/org.second/" not in found
    assert found["document"] == "document\n"


def test_the_folder_of_all_plugins_stays_when_all_are_named(world):
    assert after(world, "resetDir.a=org.example", "resetDir.b=b", folders=["org.example", "b"]) == []
    assert os.path.isdir(PLUGINS)


def test_the_users_properties_name_the_state(world):
    """Those of the installation do not count, nor do those of the launcher."""
    old = area(world, "resetDir.a=org.example")
    install(world, "old", "resetDir.b=b")
    world.write(PLUGINS + "/b/state", "b\n")
    world.write(PLUGINS + "/c/state", "c\n")
    world.write("/mnt/app/rcp/velmora.properties", read("/mnt/app/rcp/velmora.properties") + "resetDir.c=c\n")
    reset(world)
    assert [name for name in contents(PLUGINS) if name.endswith("state")] == ["b/state", "c/state"]
    assert contents(BACKUP) == old


@pytest.mark.parametrize("how", ["missing", "unreadable"])
@pytest.mark.parametrize("place", ["/rcpinstall.properties", "/config/user/rcpinstall.properties"])
def test_without_the_users_properties_those_of_the_installation_name_it(world, how, place):
    """The variant for the configuration first."""
    area(world, "resetDir.a=not.this")
    world.write(PLUGINS + "/not.this/state", "x")
    os.unlink(CONFIG + "/rcpinstall.properties") if how == "missing" else os.chmod(CONFIG + "/rcpinstall.properties", 0)
    world.base_properties("resetDir.b=unused")
    world.write(BASE + place, "resetDir.b=org.example\n")
    reset(world)
    assert [name for name in contents(PLUGINS) if name.endswith("state")] == ["not.this/state"]


def test_without_any_properties(world):
    """The reset ends before anything is moved; copies have been made by then."""
    old = area(world)
    os.unlink(CONFIG + "/rcpinstall.properties")
    os.unlink(BASE + "/rcpinstall.properties")
    del old["rcpinstall.properties"]
    failed(world, "QVMRL0106E: Unable to locate /mnt/app/base/rcpinstall.properties file.",
           "No such file or directory")
    assert contents(CONFIG) == old
    assert not os.path.exists(BACKUP)


# ---- state that cannot be removed

REASONS = [os.strerror(number) for number in range(134)]


def failed(world, message, reason=None):
    """A reset that ends with this as the last of its log, and starts nothing."""
    before = len(world.platforms())
    assert world.run("-resetconfig").status == 255
    assert len(world.platforms()) == before
    told, _, why = read(LOG).rstrip("\n").rpartition(" : ")
    assert told.endswith("\n" + message)
    assert why in ([reason] if reason else REASONS)


def problems(*found):
    """The whole of the last message, from the empty line that it begins with."""
    return lines("", "QVMRL0107E begin: Error removing metadata plugin directory", *found) + (
        "\nQVMRL0108E end: Unable to remove all files in the metadata plugin directory. Please correct the problems "
        "listed above")


def stubborn(world, path):
    """A folder whose one file cannot be removed."""
    world.write(path + "/file", "stubborn\n")
    os.chmod(path, 0o555)


def test_state_that_cannot_be_removed_ends_the_reset(world):
    """With all its problems listed; what could be removed is gone, and the configuration is the old one."""
    old = area(world, "resetDir.a=a", "resetDir.b=b")
    stubborn(world, PLUGINS + "/a")
    world.write(PLUGINS + "/b/state", "b\n")
    failed(world, problems("Can't delete file /mnt/ws/.metadata/.plugins/a/file  -  Failed with error 13: "
                           "Permission denied"))
    assert contents(CONFIG) == old
    assert not os.path.exists(BACKUP)
    # The first trouble ends it.
    assert os.path.exists(PLUGINS + "/b/state")


def test_a_folder_that_cannot_be_emptied_is_listed_as_well(world):
    """Depth first: each file, then the folder that still holds it. The others of it are gone."""
    area(world, "resetDir.a=a")
    stubborn(world, PLUGINS + "/a/one/two")
    failed(world, problems(
        "Can't delete file /mnt/ws/.metadata/.plugins/a/one/two/file  -  Failed with error 13: Permission denied",
        "Can't delete dir /mnt/ws/.metadata/.plugins/a/one/two  -  Failed with error 39: Directory not empty",
        "Can't delete dir /mnt/ws/.metadata/.plugins/a/one  -  Failed with error 39: Directory not empty"))


def test_everything_that_can_be_removed_is(world):
    """The removal never stops at a failure."""
    area(world, "resetDir.a=a")
    stubborn(world, PLUGINS + "/a/x")
    for name in "abcdefghij":
        world.write(PLUGINS + "/a/" + name + "/file")
        world.write(PLUGINS + "/a/file" + name)
    failed(world, problems(
        "Can't delete file /mnt/ws/.metadata/.plugins/a/x/file  -  Failed with error 13: Permission denied",
        "Can't delete dir /mnt/ws/.metadata/.plugins/a/x  -  Failed with error 39: Directory not empty"))
    assert contents(PLUGINS + "/a") == {"x/": None, "x/file": "stubborn\n"}


def test_a_folder_that_cannot_be_entered_is_listed(world):
    area(world, "resetDir.a=a")
    world.write(PLUGINS + "/a/closed/file", "x")
    os.chmod(PLUGINS + "/a/closed", 0)
    failed(world, problems(
        "Error in /mnt/ws/.metadata/.plugins/a/closed  -  Failed with error 13: Permission denied",
        "Can't delete dir /mnt/ws/.metadata/.plugins/a/closed  -  Failed with error 39: Directory not empty"))


def test_the_named_folder_itself_is_listed_when_only_it_stays(world):
    """It is empty by then, and its parent may not be written to."""
    area(world, "resetDir.a=p/a")
    world.write(PLUGINS + "/p/a/file", "x")
    os.chmod(PLUGINS + "/p", 0o555)
    failed(world, problems("Can't delete dir /mnt/ws/.metadata/.plugins/p/a  -  Failed with error 13: "
                           "Permission denied"))
    assert contents(PLUGINS + "/p") == {"a/": None}


def test_a_file_in_the_place_of_a_folder_is_listed_and_stays(world):
    area(world, "resetDir.a=a")
    world.write(PLUGINS + "/a", "a file\n")
    failed(world, problems("Error in /mnt/ws/.metadata/.plugins/a  -  Failed with error 20: Not a directory"))
    assert read(PLUGINS + "/a") == "a file\n"


def test_a_dangling_link_is_listed_and_stays(world):
    area(world, "resetDir.a=a")
    world.link(PLUGINS + "/a/link", "/mnt/nowhere")
    failed(world, problems("Can't stat /mnt/ws/.metadata/.plugins/a/link  -  Failed with error 2: "
                           "No such file or directory"))
    assert contents(PLUGINS + "/a") == {"link": "-> /mnt/nowhere"}


def test_a_link_to_a_file_is_removed_and_not_followed(world):
    area(world, "resetDir.a=a")
    world.write("/mnt/elsewhere/file", "precious\n")
    world.link(PLUGINS + "/a/link", "/mnt/elsewhere/file")
    reset(world)
    assert not os.path.exists(PLUGINS + "/a")
    assert contents("/mnt/elsewhere") == {"file": "precious\n"}


def test_a_link_to_a_folder_is_emptied_and_stays(world):
    """It counts as the folder that it leads to, but cannot be removed like one."""
    area(world, "resetDir.a=a")
    world.write("/mnt/elsewhere/in/file", "x")
    world.write("/mnt/beside", "precious\n")
    world.link(PLUGINS + "/a/link", "/mnt/elsewhere")
    failed(world, problems("Can't delete dir /mnt/ws/.metadata/.plugins/a/link  -  Failed with error 20: "
                           "Not a directory"))
    assert contents("/mnt/elsewhere") == {}
    assert read("/mnt/beside") == "precious\n"


def test_state_that_cannot_be_read_is_passed_over(world):
    """It counts as missing."""
    old = area(world, "resetDir.a=a")
    world.write(PLUGINS + "/a/file", "x")
    os.chmod(PLUGINS + "/a", 0)
    reset(world)
    assert contents(PLUGINS)["a/file"] == "x"
    assert contents(BACKUP) == old


def test_after_the_problem_is_corrected_the_reset_works(world):
    old = area(world, "resetDir.a=a")
    stubborn(world, PLUGINS + "/a")
    failed(world, problems("Can't delete file /mnt/ws/.metadata/.plugins/a/file  -  Failed with error 13: "
                           "Permission denied"))
    os.chmod(PLUGINS + "/a", 0o755)
    reset(world)
    assert workspace() == renewed(old, base=["resetDir.a=a"])


# ---- other trouble

def test_a_configuration_that_cannot_be_renamed(world):
    """The plug-in state is gone by then, the configuration is as it was."""
    old = area(world, "resetDir.a=org.example", update=False)
    os.chmod(WORKSPACE, 0o555)
    failed(world, "QVMRL0141E: Can't move file/dir  '/mnt/ws/.config'", "Permission denied")
    assert contents(CONFIG) == old
    assert contents(PLUGINS) == {}


def test_a_new_configuration_that_cannot_be_made(world):
    """The message has a number of its own; a later start goes on from there."""
    old = area(world)
    start = world.run("-resetconfig", strace=["-e", "trace=mkdir", "-P", UPDATE, "-e", "inject=mkdir:error=ENOSPC"])
    assert start.status == 255
    assert read(LOG).splitlines()[-1] == (
        "QVMRL0045E: Unable to create %s directory. : No space left on device" % UPDATE)
    assert contents(BACKUP) == old
    assert (read(WORKSPACE + "/registry.old"), read(WORKSPACE + "/bookmarks.xml.old")) == (REGISTRY, BOOKMARKS)
    assert world.run().status == 0
    assert contents(CONFIG) == copies("old")


def test_a_registry_that_is_a_folder_cannot_be_carried_over(world):
    """Nothing has been deleted or moved by then."""
    old = area(world, "resetDir.a=org.example", update=False)
    world.write(UPDATE + "/registry/entry", "entry\n")
    failed(world, "QVMRL0193E: Did not encounter EOF while copying file contents", "Is a directory")
    assert contents(CONFIG) == {**old, "org.eclipse.update/registry/": None,
                                "org.eclipse.update/registry/entry": "entry\n"}
    assert STATE.items() <= workspace().items()


# ---- launchers that are killed

BASE_LINES = ["resetDir.a=a"]


def prepared(world):
    old = area(world, *BASE_LINES)
    world.write(BACKUP + "/older", "older\n")
    world.write(BACKUP + "deleteme0002/leftover", "leftover\n")
    world.write(PLUGINS + "/a/deep/state", "x\n")
    world.write(PLUGINS + "/a/state", "x\n")
    return old


def carried(found):
    """Registry and bookmarks, from where they are: in the configuration, or put aside in the workspace."""
    return [found.get(".config/org.eclipse.update/" + name, found.get(name + ".old"))
            for name in ("registry", "bookmarks.xml")]


@pytest.mark.within(300)
def test_a_reset_killed_at_any_step_and_an_ordinary_start(world):
    """It works. The configuration is the whole old one, or a whole new one with the old one as the backup. Registry
    and bookmarks are in it, or lie in the workspace for good, whole. Only named plug-in state is missing."""
    old = prepared(world)
    left, outcomes, steps = set(), set(), 0
    for step in Interruptions(world, WORKSPACE, "-velmoraWait", "-resetconfig"):
        before = len(world.platforms())
        assert world.run("-velmoraWait", "-next").status == 0, step
        assert world.platforms()[before].argv == command("-velmoraWait", "-next"), step
        found = workspace()
        new = copies("old", "-velmoraWait", "-next", base=BASE_LINES)
        config = contents(CONFIG)
        assert carried(found) == [REGISTRY, BOOKMARKS], step
        if "mine.prefs" in config:
            assert config == {**old, "args.properties": new["args.properties"]}, step
        else:
            assert {name: what for name, what in config.items() if name not in CARRIED} == new, step
            assert contents(BACKUP) == old, step
        assert {**KEPT, **STATE}.items() <= found.items(), step
        assert {name for name in found if name.startswith(".metadata/.plugins/a")} <= {
            ".metadata/.plugins/a/", ".metadata/.plugins/a/deep/", ".metadata/.plugins/a/deep/state",
            ".metadata/.plugins/a/state"}, step
        left |= leftovers(found)
        outcomes.add(("mine.prefs" in config, "org.eclipse.update/registry" in config))
        steps += 1
    assert steps > 20
    assert outcomes == {(True, True), (False, False), (False, True)}
    assert left == {"registry.old", "bookmarks.xml.old", "registry.old.part", "bookmarks.xml.old.part",
                    ".configbakdeleteme000N"}
    assert documented_leftovers() == left | {"platform.xml.old.part"}


@pytest.mark.within(300)
def test_a_reset_killed_at_any_step_and_another_reset(world):
    """It works, and nothing that the first had put aside is lost."""
    prepared(world)
    for step in Interruptions(world, WORKSPACE, "-velmoraWait", "-resetconfig"):
        before = len(world.platforms())
        assert world.run("-velmoraWait", "-resetconfig", "-next").status == 0, step
        assert world.platforms()[before].argv == command("-velmoraWait", "-next"), step
        found = workspace()
        new = copies("old", "-velmoraWait", "-next", base=BASE_LINES)
        config = contents(CONFIG)
        assert {name: what for name, what in config.items() if name not in CARRIED} == new, step
        assert carried(found) == [REGISTRY, BOOKMARKS], step
        assert not [name for name in found if name.startswith(".metadata/.plugins/a/")], step
        assert {**KEPT, **STATE}.items() <= found.items(), step
