"""What a first start makes: the whole user area with its modes, and what stands in the way of each piece."""

import os

import pytest

from world import (APP, BASE, CONFIG, HEAD, HOME, INSTALL_AREA, JAVA, LOG, STARTUP, WORKSPACE, areas, lines, read,
                   read_bytes, system, tree, user_logs)

CONFIG_INI = CONFIG + "/config.ini"
EXTENSIONS = WORKSPACE + "/applications/eclipse"


@pytest.mark.parametrize("umask, folder, file", [(0o022, "0755", "0644"), (0o002, "0775", "0664"), (0, "0775", "0666"),
                                                 (0o077, "0700", "0600")])
def test_the_whole_user_area(world, umask, folder, file):
    """Folders are 0775 and files 0666, less the umask; the lock is nobody else's business."""
    world.install()
    world.run(umask=umask)
    world.all_ended()
    expected = lines(
        "D VANTOR/",
        "D VANTOR/RCP/",
        "D VANTOR/RCP/abc/",
        "D VANTOR/RCP/abc/anna/",
        "D VANTOR/RCP/abc/anna/.config/",
        "F VANTOR/RCP/abc/anna/.config/args.properties",
        "F VANTOR/RCP/abc/anna/.config/config.ini",
        "D VANTOR/RCP/abc/anna/.config/org.eclipse.update/",
        "F VANTOR/RCP/abc/anna/.config/org.eclipse.update/platform.xml",
        "F VANTOR/RCP/abc/anna/.config/rcpinstall.properties",
        "0600 VANTOR/RCP/abc/anna/.rcp.lock",
        "F VANTOR/RCP/abc/anna/.rcp.main",
        "D VANTOR/RCP/abc/anna/applications/",
        "D VANTOR/RCP/abc/anna/applications/eclipse/",
        "D VANTOR/RCP/abc/anna/applications/eclipse/features/",
        "D VANTOR/RCP/abc/anna/applications/eclipse/plugins/",
        "D VANTOR/RCP/abc/anna/logs/",
        "F VANTOR/RCP/abc/anna/logs/shutdown.log",
        "F VANTOR/RCP/abc/anna/logs/velmora.log",
    )
    assert lines(*tree(HOME)) == expected.replace("D ", folder + " ").replace("F ", file + " ")


def test_a_second_start_makes_nothing_new(world):
    world.install()
    world.run()
    world.all_ended()
    before = tree("/mnt")
    world.run()
    world.all_ended()
    assert tree("/mnt") == before


def test_a_first_start_has_nothing_to_reset(world):
    """Not even a part of the area needs to have been there."""
    world.install()
    world.write(CONFIG + "/mine")
    world.run("-resetconfig")
    assert os.path.exists(CONFIG + "/mine")
    assert not os.path.exists(CONFIG + "bak")


def test_the_area_of_a_service_lies_in_the_installation(world):
    """Its configuration stands beside the workspace, and the user's home stays empty."""
    world.install("service", "jvm.location=" + JAVA)
    world.stand_in(JAVA)
    before = tree(APP)
    world.run()
    world.all_ended()
    assert sorted(set(tree(APP)) - set(before)) == sorted([
        "0755 eclipse/",
        "0755 eclipse/.config/",
        "0644 eclipse/.config/args.properties",
        "0644 eclipse/.config/config.ini",
        "0755 eclipse/.config/org.eclipse.update/",
        "0644 eclipse/.config/org.eclipse.update/platform.xml",
        "0644 eclipse/.config/rcpinstall.properties",
        "0755 eclipse/.workspace/",
        "0600 eclipse/.workspace/.rcp.lock",
        "0644 eclipse/.workspace/.rcp.main",
        "0755 eclipse/.workspace/applications/",
        "0755 eclipse/.workspace/applications/eclipse/",
        "0755 eclipse/.workspace/applications/eclipse/features/",
        "0755 eclipse/.workspace/applications/eclipse/plugins/",
        "0755 eclipse/.workspace/logs/",
        "0644 eclipse/.workspace/logs/shutdown.log",
        "0644 eclipse/.workspace/logs/velmora.log",
    ])
    assert tree(HOME) == []


def test_an_area_that_is_there_is_used_as_it_is(world):
    """Nothing in it is replaced."""
    world.install()
    world.write(CONFIG_INI, "mine\n", 0o600)
    world.write(CONFIG + "/rcpinstall.properties", "rcp.install.id=abc\nrcp.base.location=/mnt/app/base\n")
    world.write(CONFIG + "/org.eclipse.update/platform.xml", "<mine/>\n")
    world.write(EXTENSIONS + "/features/f", "f")
    world.run()
    assert read(CONFIG_INI) == "mine\n"
    assert read(CONFIG + "/rcpinstall.properties") == "rcp.install.id=abc\nrcp.base.location=/mnt/app/base\n"
    assert read(CONFIG + "/org.eclipse.update/platform.xml") == "<mine/>\n"
    assert read(EXTENSIONS + "/features/f") == "f"


# ---- folders that cannot be made

def test_a_workspace_that_cannot_be_made(world):
    """The levels above it were tried too, so the reason is the last one's: its parent is not there."""
    world.install()
    world.folder(HOME, 0o555)
    world.fatal(world.run(), "QVMRL0083E: Unable to create %s directory." % WORKSPACE, "No such file or directory")
    assert tree(HOME) == []


def test_a_workspace_of_one_level_that_cannot_be_made(world):
    world.install()
    world.folder(HOME, 0o555)
    world.fatal(world.run("-data", HOME + "/w"), "QVMRL0083E: Unable to create /mnt/home/w directory.",
                "Permission denied")


def test_a_link_to_a_folder_is_no_workspace(world):
    """Only a folder itself counts as one, and it cannot be made where something stands."""
    world.install()
    world.folder("/mnt/real")
    world.link("/mnt/w", "/mnt/real")
    world.fatal(world.run("-data", "/mnt/w"), "QVMRL0083E: Unable to create /mnt/w directory.", "File exists")


def test_a_link_above_the_workspace_is_followed(world):
    world.install()
    world.folder("/mnt/real")
    world.link("/mnt/w", "/mnt/real")
    assert world.run("-data", "/mnt/w/x").status == 0
    assert "0755 x/" in tree("/mnt/real")


@pytest.mark.parametrize("path, message", [
    (WORKSPACE, "QVMRL0083E: Unable to create %s directory."),
    (WORKSPACE + "/logs", "QVMRL0084E: Unable to create %s directory."),
    (CONFIG, "QVMRL0093E: Unable to create %s directory."),
    (EXTENSIONS + "/features", "QVMRL0094E: Unable to create %s directory."),
    (EXTENSIONS + "/plugins", "QVMRL0095E: Unable to create %s directory."),
])
def test_a_file_in_the_place_of_a_folder(world, path, message):
    world.install()
    world.write(path)
    world.fatal(world.run(), message % path, "File exists")


@pytest.mark.parametrize("path, in_the_way, message, reason", [
    (EXTENSIONS + "/features", WORKSPACE + "/applications", "QVMRL0094E", "Not a directory"),
    (WORKSPACE, HOME + "/VANTOR", "QVMRL0083E", "Not a directory"),
])
def test_a_file_in_the_place_of_a_folder_above(world, path, in_the_way, message, reason):
    world.install()
    world.write(in_the_way)
    world.fatal(world.run(), "%s: Unable to create %s directory." % (message, path), reason)


@pytest.mark.parametrize("folder, path, message", [
    (WORKSPACE + "/applications/eclipse", EXTENSIONS + "/features", "QVMRL0094E"),
])
def test_a_folder_that_may_not_be_written(world, folder, path, message):
    world.install()
    world.folder(folder, 0o555)
    world.fatal(world.run(), "%s: Unable to create %s directory." % (message, path), "Permission denied")


def test_the_base_location_must_be_given(world):
    """Asked for before anything is made."""
    world.install()
    world.properties("rcp.install.id=abc", "install.configuration=user")
    world.fatal(world.run(), "QVMRL0050E: rcp.base.location property is missing from /mnt/app/rcp/velmora.properties")
    assert tree(HOME) == []


def test_the_install_id_is_asked_for_before_the_base_location(world):
    """Neither is there."""
    world.install()
    world.properties("install.configuration=user")
    world.fatal(world.run(), "QVMRL0016E: rcp.install.id is required for this configuration!")
    assert tree(HOME) == []


# ---- config.ini

def test_config_ini_is_copied_byte_for_byte(world):
    """Indentation, empty lines, carriage returns, long lines, text outside of ASCII, a last line without end."""
    text = "\n\n  a=1\n\t b\\\n\r\n" + "x" * 999 + "\n" + "y" * 1000 + "\n" + "ä" * 3001 + "\n\n  end"
    world.install()
    world.write(BASE + "/config.ini", text)
    world.run()
    assert read_bytes(CONFIG_INI) == text.encode()


def test_an_empty_config_ini(world):
    world.install()
    world.write(BASE + "/config.ini", "")
    assert world.run().status == 0
    assert read_bytes(CONFIG_INI) == b""


@pytest.mark.parametrize("configuration, sub", [
    ("user", "user"), ("multiuser", "user"), ("userpb", "pbuilder"), ("serial.multiuser", ""), ("service", ""),
])
def test_the_variant_of_the_installations_files(world, configuration, sub):
    """Each kind of installation may have files of its own; those without a name of their own look into the folder of
    the variants itself."""
    world.install(configuration, "jvm.location=" + JAVA)
    world.stand_in(JAVA)
    for variant in ("", "user", "pbuilder", "muservice"):
        world.write("%s/config/%s/config.ini" % (BASE, variant), "of '%s'\n" % variant)
        world.write("%s/config/%s/rcpinstall.properties" % (BASE, variant), "# of '%s'\n" % variant)
    world.run()
    config = APP + "/eclipse/.config" if configuration == "service" else CONFIG
    assert read(config + "/config.ini") == "of '%s'\n" % sub
    assert read(config + "/rcpinstall.properties").startswith("# of '%s'\n" % sub)


def test_without_a_variant_the_common_file_is_taken(world):
    """Each file on its own."""
    world.install()
    world.write(BASE + "/config/user/rcpinstall.properties", "# variant\n")
    world.run()
    assert read(CONFIG_INI) == "osgi.bundles=a, b\n"
    assert read(CONFIG + "/rcpinstall.properties").startswith("# variant\n")


def test_only_the_first_rcp_home_of_the_base_location_is_replaced_for_files(world):
    """The command has all of them replaced."""
    world.install()
    world.properties("rcp.install.id=abc", "rcp.base.location=${rcp.home}/b${rcp.home}", "install.configuration=user")
    for name in ("config.ini", "rcpinstall.properties", "platform.xml"):
        world.write("/mnt/app/b${rcp.home}/" + name, "# first only\n")
    world.stand_in("/mnt/app/b/mnt/app/linux/x86/eclipse")
    world.run()
    assert read(CONFIG_INI) == "# first only\n"
    assert world.only_platform().argv[0] == "/mnt/app/b/mnt/app/linux/x86/eclipse"


@pytest.mark.parametrize("name", ["config.ini", "rcpinstall.properties"])
def test_an_installation_without_the_file(world, name):
    world.install()
    os.unlink(BASE + "/" + name)
    world.fatal(world.run(), "QVMRL0190E: Unable to open source file /mnt/app/base/%s to be copied" % name,
                "No such file or directory")


@pytest.mark.parametrize("name", ["config.ini", "rcpinstall.properties"])
def test_an_installation_whose_file_may_not_be_read(world, name):
    world.install()
    os.chmod(BASE + "/" + name, 0)
    world.fatal(world.run(), "QVMRL0190E: Unable to open source file /mnt/app/base/%s to be copied" % name,
                "Permission denied")


@pytest.mark.parametrize("name", ["config.ini", "rcpinstall.properties"])
def test_an_installation_with_a_folder_in_the_files_place(world, name):
    world.install()
    os.unlink(BASE + "/" + name)
    world.folder(BASE + "/" + name)
    world.fatal(world.run(), "QVMRL0193E: Did not encounter EOF while copying file contents", "Is a directory")


@pytest.mark.parametrize("name", ["config.ini", "rcpinstall.properties"])
def test_an_installation_whose_file_is_no_text(world, name):
    world.install()
    world.write(BASE + "/" + name, b"a=1\nb=\xff\n")
    world.fatal(world.run(), "QVMRL0193E: Did not encounter EOF while copying file contents",
                "Invalid or incomplete multibyte or wide character")


@pytest.mark.parametrize("name", ["config.ini", "rcpinstall.properties"])
@pytest.mark.parametrize("kind, reason", [("dangling", "No such file or directory"), ("mode", "Permission denied")])
def test_a_users_copy_that_is_in_the_way(world, name, kind, reason):
    """What cannot be read counts as absent, so it is written, straight: a link that leads nowhere, a closed file."""
    world.install()
    target = CONFIG + "/" + name
    if kind == "dangling":
        world.link(target, "/mnt/none/x")
    else:
        world.write(target, "", 0)
    world.fatal(world.run(), "QVMRL0191E: Unable to open destination file %s to be copied to" % target, reason)


def test_a_users_config_ini_that_is_a_dangling_link(world):
    """It is written through the link, which stays."""
    world.install()
    world.link(CONFIG_INI, "/mnt/home/elsewhere.ini")
    world.run()
    assert os.readlink(CONFIG_INI) == "/mnt/home/elsewhere.ini"
    assert read("/mnt/home/elsewhere.ini") == "osgi.bundles=a, b\n"


def test_a_folder_in_the_place_of_the_users_config_ini(world):
    """It counts as present."""
    world.install()
    world.folder(CONFIG_INI)
    assert world.run().status == 0
    assert os.path.isdir(CONFIG_INI)


@pytest.mark.parametrize("name", ["config.ini", "rcpinstall.properties"])
def test_a_full_disk_leaves_nothing_that_a_later_start_believes(world, name):
    world.install()
    text = "x=%s\n" % ("y" * 998) * 100
    world.write(BASE + "/" + name, text)
    world.small_disk(CONFIG, 65536)
    world.fatal(world.run(), "QVMRL0192E: Encountered error copying file contents", "No space left on device")
    assert not os.path.exists(CONFIG + "/" + name)


# ---- the extension's link

def test_the_shared_extension_link_is_copied(world):
    """At every start anew."""
    world.install()
    world.write(APP + "/shared/eclipse/.eclipseextension", "id=x\n  name=y\n")
    world.run()
    assert read(EXTENSIONS + "/.eclipseextension") == "id=x\n  name=y\n"
    world.write(APP + "/shared/eclipse/.eclipseextension", "new\n")
    world.all_ended()
    world.run()
    assert read(EXTENSIONS + "/.eclipseextension") == "new\n"


def test_without_a_shared_extension_the_link_of_the_area_stays(world):
    world.install()
    world.write(EXTENSIONS + "/.eclipseextension", "mine\n")
    assert world.run().status == 0
    assert read(EXTENSIONS + "/.eclipseextension") == "mine\n"


def test_a_shared_extension_link_that_cannot_be_copied(world):
    """The start ends before it records its words."""
    world.install()
    world.write(APP + "/shared/eclipse/.eclipseextension", "x\n")
    world.folder(EXTENSIONS + "/.eclipseextension")
    world.fatal(world.run(), "QVMRL0191E: Unable to open destination file %s/.eclipseextension to be copied to"
                % EXTENSIONS, "Is a directory")
    assert tree(CONFIG) == []


def test_the_steps_come_in_a_fixed_order(world):
    """Several things are wrong at once: the first step that meets one tells it, and what came before has been made."""
    world.install("user", "eclipse.name=gone")
    os.unlink(BASE + "/config.ini")
    world.write(CONFIG)
    start = world.run()
    world.fatal(start, "QVMRL0093E: Unable to create %s directory." % CONFIG, "File exists")
    assert user_logs() == [LOG]
    assert not os.path.exists(EXTENSIONS)
    os.unlink(CONFIG)
    world.fatal(world.run(), "QVMRL0190E: Unable to open source file /mnt/app/base/config.ini to be copied",
                "No such file or directory")
    assert tree(CONFIG) == ["0644 args.properties"]
    assert os.path.isdir(EXTENSIONS + "/plugins")
    world.write(BASE + "/config.ini")
    world.fatal(world.run(), "QVMRL0007E: %s/linux/x86/gone is not executable or does not exist." % BASE,
                "No such file or directory")
    assert tree(CONFIG) == ["0644 args.properties", "0644 config.ini", "0755 org.eclipse.update/",
                            "0644 org.eclipse.update/platform.xml", "0644 rcpinstall.properties"]
    world.stand_in(BASE + "/linux/x86/gone")
    world.run()
    assert world.only_platform().argv == (
        [BASE + "/linux/x86/gone"] + HEAD[1:] + areas() + STARTUP + system() + INSTALL_AREA)


def test_what_is_believed_for_ever_is_on_the_disk_before_it_is_there(world):
    """Nothing else is flushed: what is read again at once and deleted waits for no disk."""
    world.install()
    world.write(BASE + "/platform.xml", "<p/>\n")
    assert world.run(strace=["-y", "-e", "trace=fsync,fdatasync,sync,syncfs,sync_file_range,rename,renameat"]).status == 0
    calls = [line.partition("(") for line in read("/dev/shm/strace").splitlines() if CONFIG in line]
    made = [(name.split()[-1], rest.partition(CONFIG + "/")[2].partition(">" if "sync" in name else '"')[0])
            for name, _, rest in calls]
    assert made == [
        ("fsync", "config.ini.part"), ("rename", "config.ini.part"),
        ("fsync", "rcpinstall.properties.new"), ("rename", "rcpinstall.properties.new"),
        ("fsync", "org.eclipse.update/platform.xml.part"), ("rename", "org.eclipse.update/platform.xml.part")]


def test_what_is_written_straight_is_not_flushed(world):
    """A link that leads nowhere yet is written through: nothing could appear whole there."""
    world.install()
    world.link(CONFIG_INI, "/mnt/mine.ini")
    assert world.run(strace=["-y", "-e", "trace=fsync"]).status == 0
    assert read("/mnt/mine.ini") == read(BASE + "/config.ini") != ""
    assert "mine.ini" not in read("/dev/shm/strace") and "rcpinstall.properties.new" in read("/dev/shm/strace")
