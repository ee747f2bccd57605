"""Where the launcher works: the installation, the workspace, the configuration area below it."""

import os
import pathlib
import time

import pytest

from world import (APP, HEAD, HOME, INSTALL_AREA, JAVA, LAUNCHER, STARTUP, WORKSPACE, areas, read, system, tree, until)


def works_in(world, workspace, *words, folder=None, **how):
    """The start works in that workspace; the folder is made, and the command names it as it is written."""
    assert world.run(*words, **how).status == 0
    assert world.only_platform().argv == HEAD + areas(workspace) + STARTUP + system(workspace) + INSTALL_AREA
    for name in ("/.rcp.lock", "/.config/config.ini", "/logs", "/applications/eclipse/plugins"):
        assert os.path.exists((folder or workspace) + name)


def test_the_default_is_made_of_home_id_and_user(world):
    world.install()
    works_in(world, "/mnt/other/VANTOR/RCP/abc/otto", env={"HOME": "/mnt/other", "USER": "otto"})


def test_the_default_without_a_user(world):
    world.install()
    world.fatal(world.run(env={"USER": None}), "QVMRL0037E: Couldn't find the user name!")


def test_the_default_with_an_empty_user(world):
    """It is set, so it counts."""
    world.install()
    works_in(world, HOME + "/VANTOR/RCP/abc/", env={"USER": ""})


def test_the_default_without_a_home(world):
    """It begins at the root then, where an ordinary user makes nothing."""
    world.install()
    world.fatal(world.run(env={"HOME": None}), "QVMRL0083E: Unable to create /VANTOR/RCP/abc/anna directory.",
                "No such file or directory")


def test_placeholders_are_not_resolved_in_the_default(world):
    world.install()
    works_in(world, HOME + "/VANTOR/RCP/abc/${env.HOME}", env={"USER": "${env.HOME}"})


@pytest.mark.parametrize("word, workspace", [
    ("/mnt/w", "/mnt/w"),
    ("/mnt/w/", "/mnt/w"),
    ("/mnt/w//", "/mnt/w/"),
    ("/mnt/w\\", "/mnt/w"),
    ("/mnt/w\\/", "/mnt/w\\"),
    ("/mnt/a b/ä€", "/mnt/a b/ä€"),
    ("${rcp.home}/ws", "/mnt/app/ws"),
    ("/mnt/${env.USER}/${env.NONE,x}", "/mnt/anna/x"),
    ("/mnt/${prop.rcp.install.id}", "/mnt/abc"),
    ("/mnt/w/../v", "/mnt/w/../v"),
    ("/mnt/new/.", "/mnt/new/."),  # which stands once /mnt/new is made
])
def test_the_workspace_of_the_command_line(world, word, workspace):
    """One separator at the end is dropped, placeholders are resolved; the path is not folded otherwise."""
    world.install()
    world.folder("/mnt/w")
    works_in(world, workspace, "-data", word, folder=workspace.replace("\\", "/"))


def test_a_default_is_not_made_when_a_workspace_is_given(world):
    world.install()
    works_in(world, "/mnt/w", "-data", "/mnt/w")
    assert tree(HOME) == []


def test_only_the_first_data_counts(world):
    world.install()
    world.run("-data", "/mnt/w", "-data", "/mnt/v")
    assert "-Drcp.data=/mnt/w" in world.only_platform().argv
    assert not os.path.exists("/mnt/v")


def test_data_as_the_last_word(world):
    """It is ignored, and the installation's own place is taken."""
    world.install("user", "rcp.data=/mnt/w")
    works_in(world, "/mnt/w", "-data")


def test_data_as_the_last_word_without_a_place_of_the_installation(world):
    world.install()
    works_in(world, WORKSPACE, "-data")


def test_data_after_vmargs_counts(world):
    """Its words stay with the JVM."""
    world.install()
    world.run("-vmargs", "-data", "/mnt/w")
    assert world.only_platform().argv == (
        HEAD + areas("/mnt/w") + STARTUP + ["-data", "/mnt/w"] + system("/mnt/w") + INSTALL_AREA)


def test_backslashes_are_separators_for_files_but_stay_in_the_words(world):
    world.install()
    world.write(APP + "/shared/eclipse/.eclipseextension", "shared\n")
    works_in(world, "/mnt\\w\\x", "-data", "/mnt\\w\\x", folder="/mnt/w/x")
    for name in ("/.config/org.eclipse.update/platform.xml", "/.config/rcpinstall.properties", "/logs/shutdown.log",
                 "/applications/eclipse/.eclipseextension", "/.rcp.main"):
        assert os.path.isfile("/mnt/w/x" + name)
    assert os.listdir("/mnt/w") == ["x"]


def test_what_is_recorded_below_a_path_with_backslashes_is_read_back(world):
    world.install()
    world.base_properties("-Darg=${prop.arg0}")
    world.run("-data", "/mnt\\w")
    assert "-Darg=" + LAUNCHER in world.only_platform().argv


def test_a_second_rcp_home_is_no_placeholder_for_the_workspace(world):
    """The folder keeps it in its name. The words of the command are resolved before they are looked at again, all of
    them, so the platform is sent elsewhere."""
    world.install()
    assert world.run("-data", "${rcp.home}/${rcp.home}").status == 0
    assert os.path.isdir("/mnt/app/${rcp.home}/.config")
    elsewhere = "/mnt/app//mnt/app"
    assert world.only_platform().argv == HEAD + areas(elsewhere) + STARTUP + system(elsewhere) + INSTALL_AREA


def test_a_relative_workspace_is_made_from_the_root(world):
    """Which an ordinary user may not."""
    world.install()
    world.fatal(world.run("-data", "w"), "QVMRL0083E: Unable to create w directory.", "Permission denied")


def test_a_relative_workspace_that_is_there_is_used(world):
    """As long as all its folders are; the words keep it relative."""
    world.install()
    for name in ("logs", ".config/org.eclipse.update", "applications/eclipse/features", "applications/eclipse/plugins"):
        world.folder("/mnt/w/" + name)
    works_in(world, "w", "-data", "w", folder="/mnt/w", cwd="/mnt")


# ---- a place that the installation gives

@pytest.mark.parametrize("value, workspace", [
    ("/mnt/w", "/mnt/w"),
    ("/mnt/w/", "/mnt/w"),
    ("/mnt/w\\\\", "/mnt/w"),
    ("/mnt/${env.USER}/", "/mnt/anna"),
    ("${prop.place}", "/mnt/p"),
    ("${env.PLACE,/mnt/q/}", "/mnt/q"),
])
def test_the_workspace_of_the_installation(world, value, workspace):
    """Placeholders first, then one separator at the end is dropped."""
    world.install("user", "rcp.data=" + value, "place=/mnt/p/")
    works_in(world, workspace)


def test_the_command_line_goes_before_the_installation(world):
    world.install("user", "rcp.data=/mnt/w")
    works_in(world, "/mnt/v", "-data", "/mnt/v")
    assert not os.path.exists("/mnt/w")


@pytest.mark.parametrize("value, told", [
    ("/mnt/${prop.nosuch}", "/mnt/${prop.nosuch}"),
    ("/mnt/${env.USER}/${env.NOSUCH}", "/mnt/anna/${env.NOSUCH}"),
    ("${env.NOSUCH}/${env.USER}", "${env.NOSUCH}/anna"),
    ("${rcp.home}/ws", "${rcp.home}/ws"),
])
def test_a_place_that_cannot_be_resolved(world, value, told):
    """The installation's home is no placeholder of that kind, though it works on the command line."""
    world.install("user", "rcp.data=" + value)
    world.fatal(world.run(), "QVMRL0099E: rcp.data property is invalid (%s)" % told)


# ---- the service

def test_a_service_has_fixed_places(world):
    """Neither the line nor the installation moves them."""
    world.install("service", "rcp.data=/mnt/w", "jvm.location=" + JAVA)
    world.stand_in(JAVA)
    world.run("-data", "/mnt/v")
    argv = world.only_platform().argv
    assert argv == (
        [JAVA] + system(APP + "/eclipse/.workspace", "service") + INSTALL_AREA + ["org.eclipse.core.launcher.Main",
        "-nosplash", "--launcher.suppressErrors", "-data", APP + "/eclipse/.workspace",
        "-configuration", APP + "/eclipse/.config"])
    assert not os.path.exists("/mnt/w") and not os.path.exists("/mnt/v")
    assert os.path.isdir(APP + "/eclipse/.config") and not os.path.exists(APP + "/eclipse/.workspace/.config")


def test_a_service_needs_no_user(world):
    world.install("service", "jvm.location=" + JAVA)
    world.stand_in(JAVA)
    assert world.run(env={"USER": None, "HOME": None}).status == 0
    assert world.only_platform().argv[0] == JAVA


# ---- the installation

@pytest.mark.parametrize("folder", ["/mnt/app/bin", "/mnt/app/RCP", "/mnt/app/rcp2", "/mnt/app/rcp/sub"])
def test_a_launcher_elsewhere_has_no_installation(world, folder):
    """Its home is empty, without any error of its own; so the properties are looked for at the root."""
    world.install()
    world.launcher(folder + "/velmora")
    world.fatal(world.run(program=folder + "/velmora"), "QVMRL0096E: Unable to load /rcp/velmora.properties file!",
                "No such file or directory")


def test_the_installation_may_lie_anywhere_and_the_launcher_have_any_name(world):
    world.install()
    place = pathlib.Path("/mnt/opt ä")
    pathlib.Path(APP).rename(place)
    (place / "rcp/velmora").rename(place / "rcp/start")
    world.run(program=str(place) + "/rcp/start")
    argv = world.only_platform().argv
    assert argv[0] == "/mnt/opt ä/base/linux/x86/eclipse"
    assert "-Drcp.home=/mnt/opt ä" in argv


def test_an_installation_below_a_folder_with_a_backslash_is_not_found(world):
    """A backslash is a separator wherever a path is used; the message says where the file was looked for. Nothing is
    made in the user's area."""
    world.install()
    os.rename(APP, "/mnt/a\\b")
    world.fatal(world.run(program="/mnt/a\\b/rcp/velmora"), "QVMRL0096E: Unable to load /mnt/a/b/rcp/velmora.properties "
                "file!", "No such file or directory")
    assert not os.path.exists(HOME) or os.listdir(HOME) == []


def test_an_installation_that_is_taken_away_meanwhile(world):
    """The folder of the running executable is gone before the launcher asks for it."""
    world.install()
    start = world.start(strace=["-e", "trace=readlink,readlinkat", "-e",
                                "inject=readlink,readlinkat:delay_enter=1500000"])
    until(lambda: os.readlink("/proc/%d/exe" % start.pid) == LAUNCHER, "the launcher runs")
    for name in os.listdir(APP + "/rcp"):
        os.unlink(APP + "/rcp/" + name)
    os.rmdir(APP + "/rcp")
    world.fatal(start.wait(), "QVMRL0049E: Unable to locate the platform's installation directory",
                "No such file or directory")


def test_a_system_that_does_not_tell_the_executable(world):
    if world.sanitized:
        pytest.skip("a sanitizer asks for the executable too, and complains on standard error")
    world.install()
    start = world.run(strace=["-e", "trace=readlink,readlinkat", "-e",
                              "inject=readlink,readlinkat:error=EACCES"])
    world.fatal(start, "QVMRL0184E: Getting command path failed! errno = 13", "Permission denied")


def test_an_executable_whose_path_is_too_long(world):
    """It can be started from the folder below which it lies, but not be told."""
    if world.sanitized:
        pytest.skip("a sanitizer asks for the executable too, and complains on standard error")
    os.chdir("/mnt")
    for _ in range(21):
        os.mkdir("x" * 200)
        os.chdir("x" * 200)
    with open("velmora", "wb", opener=lambda path, flags: os.open(path, flags, 0o755)) as file:
        file.write(world._launcher)
    start = world.run(program="./velmora", cwd=".")
    os.chdir("/")
    world.fatal(start, "QVMRL0184E: Getting command path failed! errno = 36", "File name too long")


# ---- the id of the installation

@pytest.mark.parametrize("configuration", ["user", "lockdown", "serial.multiuser", "multiuser", "service", "other"])
def test_an_installation_without_an_id(world, configuration):
    world.install()
    world.properties("rcp.base.location=${rcp.home}/base", "install.configuration=" + configuration)
    world.fatal(world.run(), "QVMRL0016E: rcp.install.id is required for this configuration!")
    assert tree(HOME) == []


def test_a_private_installation_makes_itself_an_id(world):
    """The seconds since 1970, appended to the launcher's own properties; the next start finds it there."""
    world.install()
    known = "rcp.base.location=${rcp.home}/base\ninstall.configuration=userpb\n"
    world.write(APP + "/rcp/velmora.properties", known)

    before = int(time.time())
    world.run()
    after = int(time.time())
    text = read(APP + "/rcp/velmora.properties")
    number = text[len(known + "rcp.install.id="):-1]
    assert text == known + "rcp.install.id=%s\n" % number
    assert before <= int(number) <= after
    world.all_ended()
    world.run()
    assert read(APP + "/rcp/velmora.properties") == text
    for platform in world.platforms():
        assert platform.argv[3] == HOME + "/VANTOR/RCP/%s/anna" % number
        assert "-Dcom.vantor.rcp.install.id=" + number in platform.argv


def test_an_id_that_is_appended_to_a_line_without_end(world):
    """It is lost in that line, so each start makes another one; this start has its own all the same."""
    world.install()
    known = "rcp.base.location=${rcp.home}/base\ninstall.configuration=userpb\nlast=1"
    world.write(APP + "/rcp/velmora.properties", known)
    assert world.run().status == 0
    first = read(APP + "/rcp/velmora.properties")
    assert first.startswith(known + "rcp.install.id=") and first.endswith("\n")
    world.all_ended()
    assert world.run().status == 0
    second = read(APP + "/rcp/velmora.properties")
    assert second.startswith(first + "rcp.install.id=")


def test_an_id_that_cannot_be_kept(world):
    world.install()
    world.properties("rcp.base.location=${rcp.home}/base", "install.configuration=userpb")
    os.chmod(APP + "/rcp/velmora.properties", 0o444)
    world.fatal(world.run(), "QVMRL0017E: Could not open /mnt/app/rcp/velmora.properties to append rcp.install.id!",
                "Permission denied")


def test_an_id_that_is_given_is_not_touched(world):
    world.install("userpb")
    before = read(APP + "/rcp/velmora.properties")
    world.run()
    assert read(APP + "/rcp/velmora.properties") == before
    assert "-Dcom.vantor.rcp.install.id=abc" in world.only_platform().argv
