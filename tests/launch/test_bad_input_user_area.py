"""The user's area in trouble: places that may not be written to, files that cannot be read, folders and links where a
file belongs, full disks, launchers that are killed. The start ends with its message or goes on; nothing that the user
had is lost, and nothing half-written is believed later."""

import os
import shutil

import pytest

from contents import contents
from interruption import Interruptions
from world import (APP, BASE, CONFIG, HEAD, HOME, INSTALL_AREA, LAUNCHER, LOG, STARTUP, USER_PROPERTIES, WORKSPACE,
                   areas, lines, read, system, user_logs)

INI = CONFIG + "/config.ini"
RECORD = CONFIG + "/args.properties"
UPDATE = CONFIG + "/org.eclipse.update"
COMMAND = HEAD + areas() + STARTUP + system() + INSTALL_AREA
OPEN_SOURCE = "QVMRL0190E: Unable to open source file %s to be copied"
OPEN_DESTINATION = "QVMRL0191E: Unable to open destination file %s to be copied to"
WRITE = "QVMRL0192E: Encountered error copying file contents"
READ = "QVMRL0193E: Did not encounter EOF while copying file contents"
BLOCK = lines("rcp.install.id=abc", "rcp.base.location=${rcp.home}/base", "install.configuration=user")
WHOLE = {
    "args.properties": lines("arg0=" + LAUNCHER, "argc=1", "com.vantor.rcp.core.internal.librarypath="),
    "config.ini": "osgi.bundles=a, b\n",
    "org.eclipse.update/": None,
    "org.eclipse.update/platform.xml": "<config>\n</config>\n",
    "rcpinstall.properties": BLOCK,
}


def works(world, whole=WHOLE, command=COMMAND):
    """The next start makes everything that is missing, whole, and starts the platform."""
    before = len(world.platforms())
    assert world.run().status == 0
    assert [platform.argv for platform in world.platforms()[before:]] == [command]
    assert contents(CONFIG) == whole


# ---- places that may not be written to

@pytest.mark.parametrize("there, words, message", [
    ([], [], "QVMRL0097E: Could not open %s for writing!" % RECORD),
    ([], ["-restart"], OPEN_DESTINATION % INI),
    (["config.ini"], ["-restart"], OPEN_DESTINATION % USER_PROPERTIES),
])
def test_a_configuration_that_may_not_be_written_to(world, there, words, message):
    """The first file that would have to be made ends the start; when it may be written to again, all is made."""
    world.install()
    for name in there:
        world.write(CONFIG + "/" + name, "osgi.bundles=a, b\n")
    world.folder(CONFIG, 0o555)
    world.fatal(world.run(*words), message, "Permission denied")
    assert list(contents(CONFIG)) == there
    os.chmod(CONFIG, 0o755)
    works(world)


def test_a_configuration_without_the_folder_for_updates_that_may_not_be_written_to(world):
    """All that is needed is there, but for platform.xml."""
    world.install()
    for name in ("args.properties", "config.ini", "rcpinstall.properties"):
        world.write(CONFIG + "/" + name, WHOLE[name])
    os.chmod(CONFIG, 0o555)
    world.fatal(world.run(), "QVMRL0039E: Unable to create %s directory." % UPDATE)
    assert "org.eclipse.update/" not in contents(CONFIG)
    os.chmod(CONFIG, 0o755)
    works(world)


@pytest.mark.parametrize("place, message", [
    (HOME, "QVMRL0083E: Unable to create %s directory." % WORKSPACE),
    (WORKSPACE + "/logs", None),
])
def test_a_workspace_or_a_log_that_cannot_be_made(world, place, message):
    """Then the lines are in /tmp."""
    world.install()
    world.folder(place, 0o555)
    start = world.run()
    assert (start.status, world.platforms(), user_logs()) == (255, [], [])
    last = world.temp_log().rstrip("\n").rpartition("\n")[2]
    if message is None:
        assert last == "QVMRL0019E: Could not open %s for writing! : Permission denied" % LOG
    else:
        assert last.startswith(message + " : ")
    os.chmod(place, 0o755)
    works(world)


@pytest.mark.parametrize("path, message", [
    (CONFIG, "QVMRL0093E: Unable to create %s directory."),
    (WORKSPACE + "/applications/eclipse/features", "QVMRL0094E: Unable to create %s directory."),
    (WORKSPACE + "/applications/eclipse/plugins", "QVMRL0095E: Unable to create %s directory."),
])
@pytest.mark.parametrize("how", ["a file", "a link to a folder", "a dangling link"])
def test_something_else_in_the_place_of_a_folder(world, path, message, how):
    """It is no folder, and stays as it is. Behind it is nothing made either."""
    world.install()
    if how == "a file":
        world.write(path, "mine\n")
    else:
        world.link(path, "/mnt/elsewhere")
    if how == "a link to a folder":
        world.write("/mnt/elsewhere/mine", "mine\n")
    world.fatal(world.run(), message % path, "File exists")
    if how == "a file":
        assert read(path) == "mine\n"
    else:
        assert os.readlink(path) == "/mnt/elsewhere"
    assert os.path.exists("/mnt/elsewhere") == (how == "a link to a folder")
    if how == "a link to a folder":
        assert contents("/mnt/elsewhere") == {"mine": "mine\n"}


def test_a_file_above_a_folder(world):
    world.install()
    world.write(WORKSPACE + "/applications", "mine\n")
    world.fatal(world.run(), "QVMRL0094E: Unable to create %s/applications/eclipse/features directory." % WORKSPACE,
                "Not a directory")
    assert read(WORKSPACE + "/applications") == "mine\n"


# ---- the installation's files

TEMPLATES = [("config.ini", INI), ("rcpinstall.properties", USER_PROPERTIES)]


@pytest.mark.parametrize("name, target", TEMPLATES)
@pytest.mark.parametrize("how, message, reason", [
    ("missing", OPEN_SOURCE, "No such file or directory"),
    ("unreadable", OPEN_SOURCE, "Permission denied"),
    ("a folder", READ, "Is a directory"),
    ("a link to itself", OPEN_SOURCE, "Too many levels of symbolic links"),
    ("foreign bytes", READ, "Invalid or incomplete multibyte or wide character"),
])
def test_a_template_that_cannot_be_copied(world, name, target, how, message, reason):
    """Nothing stands at the target then, so the next start makes it."""
    world.install()
    template = BASE + "/" + name
    good = read(template)
    if how == "unreadable":
        os.chmod(template, 0)
    elif how == "foreign bytes":
        world.write(template, b"a=1\n" * 1000 + b"b=gr\xf6\xdfe\n")
    else:
        os.unlink(template)
        if how == "a folder":
            world.folder(template)
        elif how == "a link to itself":
            world.link(template, name)
    world.fatal(world.run(), message % template if "%s" in message else message, reason)
    assert [found for found in contents(CONFIG) if found.startswith(name)] == []
    if how == "a folder":
        os.rmdir(template)
    elif how != "missing":
        os.unlink(template)
    world.write(template, good)
    works(world)


def test_an_installation_that_does_not_name_its_configuration(world):
    """The copy must know it. The plain copy and the unfinished one stay as they are, and the next start believes the
    plain one."""
    world.install(None)
    world.base_properties("a=1", "b.win32=2")
    left = {"args.properties": WHOLE["args.properties"], "config.ini": WHOLE["config.ini"],
            "rcpinstall.properties": "a=1\nb.win32=2\n", "rcpinstall.properties.new": "a=1\n"}
    world.fatal(world.run(), "QVMRL0008E: Unable to calculate necessary values for user specific rcpinstall.properties "
                             "file.")
    assert contents(CONFIG) == left
    world.fatal(world.run(), "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, "
                             "reinstall.")
    assert left.items() <= contents(CONFIG).items()


# ---- the user's copies

@pytest.mark.parametrize("mode", [0o000, 0o200])
@pytest.mark.parametrize("path", [INI, USER_PROPERTIES])
def test_a_copy_that_may_not_be_read(world, path, mode):
    """It counts as missing, but is not made anew, since for that it is opened for reading too; it stays."""
    world.install()
    world.write(path, "mine\n", mode)
    world.fatal(world.run(), OPEN_DESTINATION % path, "Permission denied")
    assert contents(CONFIG)[os.path.basename(path)] == "mine\n"


@pytest.mark.parametrize("path", [INI, USER_PROPERTIES])
def test_a_copy_that_is_there_is_believed(world, path):
    """Even an empty one, which for the properties means that the start ends for want of them."""
    world.install()
    world.write(path)
    start = world.run()
    assert read(path) == ""
    assert start.status == (0 if path == INI else 255)
    if path == USER_PROPERTIES:
        world.fatal(start, "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, "
                           "reinstall.")


@pytest.mark.parametrize("path", [INI, USER_PROPERTIES])
def test_a_folder_in_the_place_of_a_copy_is_there(world, path):
    """It is left alone; as properties it has none."""
    world.install()
    world.write(path + "/mine", "mine\n")
    start = world.run()
    assert start.status == (0 if path == INI else 255)
    assert contents(path) == {"mine": "mine\n"}


def test_a_dangling_link_in_the_place_of_the_configuration_file(world):
    """It is written through."""
    world.install()
    world.link(INI, "/mnt/elsewhere.ini")
    works(world, {**WHOLE, "config.ini": "-> /mnt/elsewhere.ini"})
    assert read("/mnt/elsewhere.ini") == "osgi.bundles=a, b\n"


def test_a_dangling_link_in_the_place_of_the_users_properties(world):
    """The plain copy goes through it; the finished one replaces the link."""
    world.install()
    world.base_properties("a=1")
    world.link(USER_PROPERTIES, "/mnt/elsewhere.properties")
    works(world, {**WHOLE, "rcpinstall.properties": "a=1\n" + BLOCK})
    assert read("/mnt/elsewhere.properties") == "a=1\n"


@pytest.mark.parametrize("path", [INI, USER_PROPERTIES])
def test_a_link_to_a_good_copy_is_believed(world, path):
    world.install()
    name = os.path.basename(path)
    world.write("/mnt/elsewhere", WHOLE[name])
    world.link(path, "/mnt/elsewhere")
    works(world, {**WHOLE, name: "-> /mnt/elsewhere"})
    assert read("/mnt/elsewhere") == WHOLE[name]


@pytest.mark.parametrize("path", [INI, USER_PROPERTIES])
def test_a_link_to_itself_in_the_place_of_a_copy(world, path):
    world.install()
    world.link(path, os.path.basename(path))
    world.fatal(world.run(), OPEN_DESTINATION % path, "Too many levels of symbolic links")
    assert os.readlink(path) == os.path.basename(path)


def test_a_folder_in_the_place_of_the_unfinished_copy(world):
    """That is told and survived: whatever has that name becomes the users' properties. As such it has none, so that the
    start ends for want of them, and each later one too until somebody removes it."""
    world.install()
    world.write(USER_PROPERTIES + ".new/mine", "mine\n")
    told = "QVMRL0074E: Unable to open user specific rcpinstall.properties and temporary rcpinstall.properties files."
    for expected in (1, 0):
        world.fatal(world.run(), "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, "
                                 "reinstall.")
        assert read(LOG).splitlines().count(told) == expected
        assert contents(USER_PROPERTIES) == {"mine": "mine\n"}
        assert not os.path.lexists(USER_PROPERTIES + ".new")
    shutil.rmtree(USER_PROPERTIES)
    works(world)


@pytest.mark.parametrize("aside", ["config.ini.part", "rcpinstall.properties.part", "rcpinstall.properties.new",
                                   "org.eclipse.update/platform.xml.part"])
def test_what_a_killed_launcher_has_left_aside(world, aside):
    """It is written again from its beginning, and is gone."""
    world.install()
    world.write(CONFIG + "/" + aside, "half of a line that is longer than everything that comes\n" * 10)
    works(world)


@pytest.mark.parametrize("aside", ["config.ini.part", "rcpinstall.properties.part",
                                   "org.eclipse.update/platform.xml.part"])
def test_a_folder_in_the_place_aside(world, aside):
    """Then the file is written straight."""
    world.install()
    world.write(CONFIG + "/" + aside + "/mine", "mine\n")
    works(world, {**WHOLE, aside + "/": None, aside + "/mine": "mine\n"})


# ---- the shared extension link

SHARED = APP + "/shared/eclipse/.eclipseextension"
EXTENSION = WORKSPACE + "/applications/eclipse/.eclipseextension"


def test_the_shared_extension_link_is_copied_each_time(world):
    """Its absence is no error."""
    world.install()
    works(world)
    assert not os.path.exists(EXTENSION)
    for text in ("one and more\n", "two\n"):
        world.write(SHARED, text)
        works(world)
        assert read(EXTENSION) == text


@pytest.mark.parametrize("how, message, reason", [
    ("a folder at the source", READ, "Is a directory"),
    ("a folder at the target", OPEN_DESTINATION % EXTENSION, "Is a directory"),
    ("a target that may not be written to", OPEN_DESTINATION % EXTENSION, "Permission denied"),
])
def test_a_shared_extension_link_that_cannot_be_copied(world, how, message, reason):
    world.install()
    if how == "a folder at the source":
        world.folder(SHARED)
    else:
        world.write(SHARED, "shared\n")
        if how == "a folder at the target":
            world.folder(EXTENSION)
        else:
            world.write(EXTENSION, "mine\n", 0o444)
    world.fatal(world.run(), message, reason)


def test_a_shared_extension_link_that_cannot_be_read_counts_as_missing(world):
    world.install()
    world.write(SHARED, "shared\n", 0)
    works(world)
    assert not os.path.exists(EXTENSION)


# ---- full disks

# A page of the disk for each file of the configuration, in the order in which they are made.
FULL = [
    (0, "QVMRL0117E: Error writing to %s file." % RECORD, {"args.properties": ""}),
    (1, WRITE, {"args.properties": WHOLE["args.properties"]}),
    (2, WRITE, {name: WHOLE[name] for name in ("args.properties", "config.ini")}),
]


@pytest.mark.parametrize("pages, message, left", FULL)
def test_a_disk_that_is_full_for_a_file_that_must_be_whole(world, pages, message, left):
    """The start ends, and what could not be written is not there. With room again, the next one makes it."""
    world.install()
    world.base_properties("a=1")
    world.small_disk(CONFIG, 4096 * 9)
    world.write(CONFIG + "/filler", "x" * 4096 * (9 - pages))
    world.fatal(world.run(), message, "No space left on device")
    os.unlink(CONFIG + "/filler")
    assert contents(CONFIG) == left
    works(world, {**WHOLE, "rcpinstall.properties": "a=1\n" + BLOCK})


def test_a_disk_that_is_full_for_the_finished_properties(world):
    """That is told and survived: what there is of them becomes the users', so that a later start believes it, and ends
    for want of what is missing."""
    world.install()
    world.base_properties("a=1")
    world.small_disk(CONFIG, 4096 * 9)
    world.write(CONFIG + "/filler", "x" * 4096 * 6)
    message = "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, reinstall."
    world.fatal(world.run(), message)
    assert ("QVMRL0015E: Unable to append values to user specific rcpinstall.properties file."
            in read(LOG).splitlines())
    os.unlink(CONFIG + "/filler")
    assert ("a=1\n" + BLOCK).startswith(read(USER_PROPERTIES))
    assert sorted(contents(CONFIG)) == ["args.properties", "config.ini", "org.eclipse.update/",
                                        "org.eclipse.update/platform.xml", "rcpinstall.properties"]
    assert world.run().status == 255


def test_a_disk_that_is_full_for_the_update_configuration(world):
    """That is told, and the start goes on; what there is of it is believed."""
    world.install()
    world.base_properties("a=1")
    world.small_disk(UPDATE, 4096)
    world.write(UPDATE + "/filler", "x" * 4096)
    assert world.run("-velmoraWait").status == 0
    assert ("QVMRL0103E: Error while copying platform.xml to user specific platform.xml file."
            in read(LOG).splitlines())
    assert contents(UPDATE) == {"filler": "x" * 4096, "platform.xml": ""}
    assert len(world.platforms()) == 1


# ---- launchers that are killed

@pytest.mark.within(300)
def test_a_first_start_killed_at_any_step(world):
    """The next one leaves the same as if nothing had happened, and nothing beside it."""
    world.install()
    world.base_properties("# a comment", "a.linux=1", "b=" + "x" * 40)
    whole = {**WHOLE, "rcpinstall.properties": lines("# a comment", "a=1", "b=" + "x" * 40) + BLOCK}
    steps = 0
    for step in Interruptions(world, HOME):
        works(world, whole)
        found = contents(WORKSPACE)
        assert {name.split("/")[0] for name in found} == {
            ".config", ".rcp.lock", ".rcp.main", "applications", "logs"}, step
        assert sorted(name for name in found if name.startswith("logs/")) == [
            "logs/", "logs/shutdown.log", "logs/velmora.log"], step
        steps += 1
    assert steps > 20
