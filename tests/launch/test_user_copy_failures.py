"""Copies in the user's area that the system does not take."""

from contents import contents
from world import CONFIG, LOG, USER_PROPERTIES, lines, read

UPDATE = CONFIG + "/org.eclipse.update"
NEW = USER_PROPERTIES + ".new"
CANNOT_OPEN = ("QVMRL0074E: Unable to open user specific rcpinstall.properties and temporary rcpinstall.properties "
               "files.\n")


def test_a_new_file_that_cannot_be_opened(world):
    """The copy is gone and nothing takes its place, so the start ends where it is read. The next start makes it."""
    world.install()
    start = world.run(strace=["-e", "trace=openat", "-P", NEW, "-e", "inject=openat:error=EACCES"])
    assert read("/dev/shm/strace").count("INJECTED") == 1
    world.fatal(start, "QVMRL0096E: Unable to load %s file!" % USER_PROPERTIES, "No such file or directory")
    assert world.log().count(CANNOT_OPEN) == 1
    assert [name for name in contents(CONFIG) if name.startswith("rcpinstall.properties")] == []
    assert world.run().status == 0
    assert read(USER_PROPERTIES) == lines(
        "rcp.install.id=abc", "rcp.base.location=${rcp.home}/base", "install.configuration=user")
    assert len(world.platforms()) == 1


def test_a_copy_that_does_not_come_to_the_disk(world):
    """Nothing of it is left to be believed; the next start makes it."""
    world.install()
    start = world.run(strace=["-e", "trace=fsync", "-P", CONFIG + "/config.ini.part", "-e", "inject=fsync:error=EIO"])
    world.fatal(start, "QVMRL0192E: Encountered error copying file contents", "Input/output error")
    assert [name for name in contents(CONFIG) if name.startswith("config.ini")] == []
    assert world.run().status == 0
    assert read(CONFIG + "/config.ini") == "osgi.bundles=a, b\n"
    assert len(world.platforms()) == 1


def test_an_update_configuration_that_cannot_take_its_place(world):
    """That is told, and the start goes on; the next one makes it."""
    world.install()
    start = world.run("-velmoraWait", strace=["-e", "trace=rename", "-e", "inject=rename:error=EIO:when=3"])
    refused = [line for line in read("/dev/shm/strace").splitlines() if line.endswith("(INJECTED)")]
    assert len(refused) == 1 and UPDATE + "/platform.xml" in refused[0], refused
    assert (start.status, len(world.platforms())) == (0, 1)
    assert [line for line in read(LOG).splitlines() if line.startswith("QVMRL0103E")] == [
        "QVMRL0103E: Error while copying platform.xml to user specific platform.xml file."]
    assert contents(UPDATE) == {}
    assert world.run("-velmoraWait").status == 0
    assert contents(UPDATE) == {"platform.xml": "<config>\n</config>\n"}
