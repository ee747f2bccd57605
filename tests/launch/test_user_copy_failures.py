"""The user's rcpinstall.properties whose rewriting cannot begin."""

from contents import contents
from world import CONFIG, USER_PROPERTIES, lines, read

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
