"""On a new provisioning level the JVM's shared classes are removed before it starts."""

import os

import pytest

from world import (BASE, ECLIPSE, HEAD, INSTALL_AREA, LOCK, PROPERTIES, STARTUP, USER_PROPERTIES, WORKSPACE, areas, lines,
                   read, system, tree)

CACHE = "/mnt/cache"
ARGV = HEAD + areas() + STARTUP + system() + INSTALL_AREA
BEGIN = "QVMRL0132I: ===== Begin Launch Parameters =====\n"
NOT_FOUND = 'QVMRL0125I: No jvm.properties file was loaded. A default file should be at "${rcp.home}/rcp/deploy"\n'


def install(world, *of_the_user, level="2"):
    world.install("user", "provisioning.manifest.version=" + level)
    world.base_properties("jvm.shareclasses.fullpath=" + CACHE, *of_the_user)
    world.write(CACHE + "/a")
    world.write(CACHE + "/sub/sub/b")


def told(world):
    """What the log has between the search for the JVM's properties and the command."""
    log = world.log()
    return log[log.index(NOT_FOUND) + len(NOT_FOUND):log.index(BEGIN)]


@pytest.mark.parametrize("of_the_user", [[], ["provisioning.manifest.version=1"], ["provisioning.manifest.version=2 x"],
                                         ["provisioning.manifest.version="]])
def test_a_new_level_empties_the_folder(world, of_the_user):
    """The user's level differs or is missing; the folder itself stays, and nothing is told."""
    install(world, *of_the_user)
    assert world.run().status == 0
    assert tree(CACHE) == [] and os.path.isdir(CACHE)
    assert told(world) == ""
    assert world.only_platform().argv == ARGV


def test_the_same_level_leaves_it(world):
    install(world, "provisioning.manifest.version=2")
    world.run()
    assert tree(CACHE) == ["0644 a", "0755 sub/", "0755 sub/sub/", "0644 sub/sub/b"]


def test_without_the_property_nothing_is_removed(world):
    world.install("user", "provisioning.manifest.version=2")
    world.run()
    assert told(world) == ""
    assert world.only_platform().argv == ARGV


def test_a_folder_that_does_not_exist(world):
    world.install("user", "provisioning.manifest.version=2")
    world.base_properties("jvm.shareclasses.fullpath=/mnt/none")
    world.run()
    assert told(world) == ""
    assert world.only_platform().argv == ARGV


def test_the_path_is_resolved_and_its_separators_turned(world):
    install(world)
    world.base_properties("place=mnt", "jvm.shareclasses.fullpath=\\\\${prop.place}\\\\cache")
    world.run()
    assert tree(CACHE) == []


@pytest.mark.parametrize("level, left", [("2", ["0644 a", "0755 sub/", "0755 sub/sub/", "0644 sub/sub/b"]), ("1", [])])
def test_a_level_is_resolved_before_it_is_compared(world, level, left):
    install(world, "provisioning.manifest.version=${env.L}")
    assert world.run(env={"L": level}).status == 0
    assert tree(CACHE) == left


def test_the_level_of_the_installation_is_compared_as_it_stands(world):
    """Though the user's is resolved: the same placeholder on both sides is no equal level."""
    install(world, "provisioning.manifest.version=${env.L}", level="${env.L}")
    world.run(env={"L": "2"})
    assert tree(CACHE) == []


def test_level_and_folder_may_be_the_jvms_own_properties(world):
    world.install("user", "provisioning.manifest.version=2")
    world.jvm_properties("provisioning.manifest.version=1", "jvm.shareclasses.fullpath=" + CACHE)
    world.write(CACHE + "/a")
    world.run()
    assert tree(CACHE) == []


def test_it_is_emptied_after_the_start_was_recorded(world):
    """So a folder of logs is empty, and a start that cannot be recorded leaves the classes."""
    world.install("user", "provisioning.manifest.version=2")
    world.base_properties("jvm.shareclasses.fullpath=${workspace.location}/logs")
    assert world.run("-velmoraWait").status == 0
    assert tree(WORKSPACE + "/logs") == []
    install(world)
    world.folder(WORKSPACE + "/logs/shutdown.log")
    os.unlink(USER_PROPERTIES)
    assert world.run().status == 255
    assert tree(CACHE) == ["0644 a", "0755 sub/", "0755 sub/sub/", "0644 sub/sub/b"]


def test_it_is_emptied_before_the_command_is_made(world):
    install(world)
    world.properties(*read(PROPERTIES).splitlines(), "eclipse.name=gone")
    world.fatal(world.run(), "QVMRL0007E: %s/linux/x86/gone is not executable or does not exist." % BASE,
                "No such file or directory")
    assert tree(CACHE) == []


def test_a_daemon_process_removes_it_too(world):
    install(world)
    holder = world.holder(ECLIPSE)
    world.write(LOCK, "%d          " % holder.pid)
    world.run()
    assert tree(CACHE) == []
    assert "-useDaemon" in world.only_platform().argv


def collected(*report):
    return lines("", "QVMRL0086I begin: Information collected while removing shared classes directory", *report, "",
                 "QVMRL0087I end: Unable to remove all files in the shared classes directory.")


def test_what_cannot_be_removed_is_told_and_the_start_goes_on(world):
    """Depth first: a file in a closed folder, then that folder, which is tried all the same."""
    install(world)
    world.folder(CACHE + "/sub/sub", 0o555)
    assert world.run().status == 0
    assert told(world) == collected(
        "Can't delete file /mnt/cache/sub/sub/b  -  Failed with error 13: Permission denied",
        "Can't delete dir /mnt/cache/sub/sub  -  Failed with error 39: Directory not empty",
        "Can't delete dir /mnt/cache/sub  -  Failed with error 39: Directory not empty")
    assert tree(CACHE) == ["0755 sub/", "0555 sub/sub/", "0644 sub/sub/b"]
    assert world.only_platform().argv == ARGV


def test_a_link_to_a_folder_is_emptied_and_stays(world):
    """Links are followed, but the link itself is no folder that could be removed."""
    install(world)
    world.write("/mnt/outside/kept/c")
    world.link(CACHE + "/link", "/mnt/outside")
    world.run()
    assert told(world) == collected("Can't delete dir /mnt/cache/link  -  Failed with error 20: Not a directory")
    assert tree(CACHE) == ["link -> /mnt/outside"]
    assert tree("/mnt/outside") == []


def test_a_link_that_leads_nowhere_stays(world):
    install(world)
    world.link(CACHE + "/link", "/mnt/nowhere")
    world.run()
    assert told(world) == collected("Can't stat /mnt/cache/link  -  Failed with error 2: No such file or directory")
    assert tree(CACHE) == ["link -> /mnt/nowhere"]


def test_a_link_to_a_file_is_removed_not_the_file(world):
    install(world)
    world.write("/mnt/file", "kept")
    world.link(CACHE + "/link", "/mnt/file")
    world.run()
    assert (tree(CACHE), told(world), read("/mnt/file")) == ([], "", "kept")


def test_a_file_in_the_place_of_the_folder(world):
    world.install("user", "provisioning.manifest.version=2")
    world.base_properties("jvm.shareclasses.fullpath=/mnt/file")
    world.write("/mnt/file")
    world.run()
    assert told(world) == collected("Error in /mnt/file  -  Failed with error 20: Not a directory")
    assert os.path.exists("/mnt/file")


def test_a_name_that_looks_like_a_format(world):
    """It is the report's text, not a format of its own."""
    install(world)
    world.link(CACHE + "/%n%s%%", "/mnt/nowhere")
    world.run()
    assert told(world) == collected(
        "Can't stat /mnt/cache/%n%s%%  -  Failed with error 2: No such file or directory")


def test_a_report_that_is_too_long_for_a_line(world):
    """100 links that lead nowhere, each of them told. The report is a line of the log like any other, with an empty
    one at its head: it is cut to 4095 bytes, and the platform starts."""
    install(world)
    for number in range(100):
        world.link(CACHE + "/link%02d" % number, "/mnt/nowhere")
    assert world.run().status == 0
    assert len(tree(CACHE)) == 100
    # The order is that of the folder, which nothing changes any more.
    whole = collected(*("Can't stat %s/%s  -  Failed with error 2: No such file or directory" % (CACHE, name)
                        for name in os.listdir(CACHE)))
    assert len(whole) > 7000
    assert told(world) == whole[:4095] + "\n"
    assert world.only_platform().argv == ARGV
