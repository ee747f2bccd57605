"""The order of the words: the platform's native executable, or the JVM itself in a service installation."""

import pytest

from world import (APP, BASE, CONFIG, ECLIPSE, HEAD, HOME, INSTALL_AREA, JAVA, STARTUP, WORKSPACE, areas, read,
                   system)

EVERYTHING = [
    "jvm.location=" + JAVA,
    "product=org.prod",
    "osgi.splashPath=file:/mnt/s.bmp",
]
EVERYTHING_OF_THE_BASE = [
    "cp=/mnt/cp.jar",
    "Xbootclasspath.append=/mnt/a.jar",
    "Xbootclasspath.prepend=/mnt/p.jar",
    "-Xmx 512m",
    "-Dfoo=bar",
    "vmarg.b=-Xb",
    "vmarg.a=-Xa",
    "vmfix.noconsole=-Dlog=${workspace.location}/x",
    "personality=org.pers",
    "plugincustomization=/mnt/c.ini",
    "application=org.app",
]


def test_the_native_kind_with_every_group(world):
    world.install("user", *EVERYTHING)
    world.base_properties(*EVERYTHING_OF_THE_BASE)
    assert world.run("-foo", "-vmargs", "-Xfoo", "-Dbar=1").status == 0
    platform = world.only_platform()
    assert platform.argv == [
        ECLIPSE,
        "--launcher.suppressErrors",
        "-foo",
        "-data", WORKSPACE,
        "-configuration", CONFIG,
        "-application", "org.app",
        "-plugincustomization", "/mnt/c.ini",
        "-product", "org.prod",
        "-personality", "org.pers",
        "-vm", JAVA,
        "-startup", BASE + "/launcher.jar",
        "-vmargs",
        "-Xfoo", "-Dbar=1",
        "-Dlog=" + WORKSPACE + "/x",
        "-Xa", "-Xb",
        "-Drcp.home=" + APP,
        "-Drcp.data=" + WORKSPACE,
        "-Dosgi.splashPath=file:/mnt/s.bmp",
        "-Dcom.vantor.rcp.install.id=abc",
        "-Drcp.install.config=user",
        "-Dfoo=bar",
        "-Drcp.osgi.install.area=" + APP + "/rcp/eclipse",
        "-Xmx512m",
        "-Xbootclasspath/p:/mnt/p.jar",
        "-Xbootclasspath/a:/mnt/a.jar",
        "-cp", "/mnt/cp.jar",
    ]
    assert (platform.program, platform.exe) == (ECLIPSE, ECLIPSE)


def test_the_direct_kind_with_every_group(world):
    world.install("service", *EVERYTHING)
    world.base_properties(*EVERYTHING_OF_THE_BASE)
    world.stand_in(JAVA)
    assert world.run("-foo", "-vmargs", "-Xfoo", "-Dbar=1").status == 0
    platform = world.only_platform()
    assert platform.argv == [
        JAVA,
        "-Xfoo", "-Dbar=1",
        "-Dlog=" + APP + "/eclipse/.workspace/x",
        "-Xa", "-Xb",
        "-Drcp.home=" + APP,
        "-Drcp.data=" + APP + "/eclipse/.workspace",
        "-Dosgi.splashPath=file:/mnt/s.bmp",
        "-Dcom.vantor.rcp.install.id=abc",
        "-Drcp.install.config=service",
        "-Dfoo=bar",
        "-Drcp.osgi.install.area=" + APP + "/rcp/eclipse",
        "-Xmx512m",
        "-Xbootclasspath/p:/mnt/p.jar",
        "-Xbootclasspath/a:/mnt/a.jar",
        "-cp", "/mnt/cp.jar",
        "org.eclipse.core.launcher.Main",
        "-nosplash",
        "--launcher.suppressErrors",
        "-foo",
        "-data", APP + "/eclipse/.workspace",
        "-configuration", APP + "/eclipse/.config",
        "-application", "org.app",
        "-plugincustomization", "/mnt/c.ini",
        "-product", "org.prod",
        "-personality", "org.pers",
    ]
    assert (platform.program, platform.exe) == (JAVA, JAVA)


@pytest.mark.parametrize("configuration", ["user", "serial.multiuser", "multiuser", "userpb"])
def test_the_bare_native_kind(world, configuration):
    """The least that an installation can say gives the least command; only the configuration's name differs."""
    world.install(configuration)
    assert world.run().status == 0
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + system(configuration=configuration) + INSTALL_AREA)


def test_the_bare_native_kind_in_lockdown(world):
    """An exit word that is neither of the two known ones ends the supervision after the first platform."""
    world.install("lockdown")
    world.plan("write", HOME + "/.exitData", "bye")
    assert world.run().status == 0
    assert world.only_platform().argv == HEAD + areas() + STARTUP + system(configuration="lockdown") + INSTALL_AREA


@pytest.mark.world(uid=0)
def test_the_bare_native_kind_in_lockdown_for_the_administrator(world):
    """The administrator is not supervised: his start returns while the platform lives, without any exit word."""
    world.install("lockdown")
    world.plan("wait")
    assert world.run().status == 0
    platform = world.only_platform()
    assert platform.alive()
    assert platform.argv == HEAD + areas() + STARTUP + system(configuration="lockdown") + INSTALL_AREA


def test_the_bare_direct_kind(world):
    """No class path, no VM argument: the main class follows the system properties."""
    world.install("service", "jvm.location=" + JAVA)
    world.stand_in(JAVA)
    assert world.run().status == 0
    assert world.only_platform().argv == (
        [JAVA] + system(APP + "/eclipse/.workspace", "service") + INSTALL_AREA + ["org.eclipse.core.launcher.Main",
        "-nosplash", "--launcher.suppressErrors", "-data", APP + "/eclipse/.workspace",
        "-configuration", APP + "/eclipse/.config"])


@pytest.mark.parametrize("word", ["Service", "users", "lockdow", "mu.service"])
def test_an_unknown_configuration_is_refused_only_when_its_name_is_needed(world, word):
    """The comparison is exact. The text speaks of the install id, although the configuration is the cause."""
    world.install(word)
    world.fatal(world.run(), "QVMRL0025E: The platform rcp.install.id must be provided for this configuration!")


def test_the_name_of_the_native_executable(world):
    world.install("user", "eclipse.name=platform-ui")
    world.stand_in(BASE + "/linux/x86/platform-ui")
    world.run()
    assert world.only_platform().argv[0] == BASE + "/linux/x86/platform-ui"


def test_the_native_executable_must_be_there(world):
    world.install("user", "eclipse.name=gone")
    world.fatal(world.run(), "QVMRL0007E: %s is not executable or does not exist." % (BASE + "/linux/x86/gone"),
                "No such file or directory")


def test_the_native_executable_must_be_executable_for_its_owner(world):
    """The owner's bit alone is looked at."""
    world.install()
    world.write(ECLIPSE, "", 0o655)
    world.fatal(world.run(), "QVMRL0007E: %s is not executable or does not exist." % ECLIPSE)


def test_a_users_copy_without_the_base_location(world):
    """The command takes the base location from the user's own properties, which are believed once they exist."""
    world.install()
    world.write(CONFIG + "/rcpinstall.properties", "rcp.install.id=abc\n")
    world.fatal(world.run(), "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, "
                             "reinstall.")


def test_a_users_copy_decides_on_the_base_location_and_id(world):
    world.install()
    world.write(CONFIG + "/rcpinstall.properties", "rcp.install.id=mine\nrcp.base.location=/mnt/other\n")
    world.stand_in("/mnt/other/linux/x86/eclipse")
    world.run()
    assert world.only_platform().argv == [
        "/mnt/other/linux/x86/eclipse", "--launcher.suppressErrors", *areas(),
        "-startup", "/mnt/other/launcher.jar", "-vmargs", "-Drcp.home=/mnt/app", "-Drcp.data=" + WORKSPACE,
        "-Dcom.vantor.rcp.install.id=mine", "-Drcp.install.config=user", *INSTALL_AREA]


@pytest.mark.parametrize("configuration, message", [
    ("user", "QVMRL0005E: Couldn't find the rcp.install.id property!"),
    ("service", "QVMRL0036E: Couldn't find the rcp.install.id property!"),
])
def test_a_users_copy_without_the_id(world, configuration, message):
    """Whichever group comes first in the command asks first: the platform options, or the system properties."""
    world.install(configuration, "jvm.location=" + JAVA)
    config = APP + "/eclipse/.config" if configuration == "service" else CONFIG
    world.write(config + "/rcpinstall.properties", "rcp.base.location=/mnt/app/base\n")
    world.fatal(world.run(), message)


def test_a_service_without_a_vm_starts_its_first_word(world):
    """No VM is named, so the first system property stands in the program's place; that cannot be started."""
    world.install("service")
    start = world.run()
    assert (start.status, world.platforms()) == (0, [])
    log = read(APP + "/eclipse/.workspace/logs/velmora.log").splitlines()
    begin = log.index("QVMRL0132I: ===== Begin Launch Parameters =====")
    assert log[begin + 1] == "-Drcp.home=/mnt/app"
    assert "Unable to execute -Drcp.home=/mnt/app : No such file or directory" in log
