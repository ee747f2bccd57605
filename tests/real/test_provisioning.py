"""Starts that bring a user to the installation's level, and the first run of a configuration."""

from example import (BASE, CONFIG, JAVA, USER_PROPERTIES, WORKSPACE, launched, lines, read)


def test_a_first_start_provisions_and_the_next_one_starts_the_platform(example):
    example.offer_provisioning()
    first = example.run("-velmoraWait").report()
    assert first["level of the user"] == ["(none)"]
    assert first["level wanted"] == ["1"]
    assert first["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-userProvLaunch"]
    assert read(USER_PROPERTIES) == read(BASE + "/rcpinstall.properties") + lines(
        "rcp.install.id=demo-1",
        "vm=${rcp.home}/rcp/eclipse/plugins/velmora.demo.jvm/jre/bin/java",
        "rcp.base.location=${rcp.home}/rcp/eclipse/plugins/base",
        "install.configuration=user",
        "provisioning.manifest.version=1",
        "demo.setup.complete=true",
    )
    second = example.run("-velmoraWait").report()
    assert second["says"] == ["The platform runs, and was given:"]
    assert second["arguments"] == ["--launcher.suppressErrors", "-velmoraWait"]


def test_the_provisioning_command_names_its_application_after_the_platforms(example):
    example.offer_provisioning()
    example.run("-velmoraWait")
    words = launched()
    assert words[:words.index("-vmargs")] == [
        BASE + "/linux/x86/eclipse",
        "--launcher.suppressErrors",
        "-velmoraWait",
        "-data", WORKSPACE,
        "-configuration", CONFIG,
        "-application", "velmora.demo.platform",
        "-application", "velmora.demo.provisioning",
        "-userProvLaunch",
        "-vm", JAVA,
        "-startup", BASE + "/launcher.jar",
    ]


def test_a_new_level_provisions_again(example):
    example.offer_provisioning()
    example.run("-velmoraWait")
    example.run("-velmoraWait")
    example.configure("provisioning.manifest.version", "2")
    update = example.run("-velmoraWait").report()
    assert (update["level of the user"], update["level wanted"]) == (["1"], ["2"])
    assert read(USER_PROPERTIES).endswith("provisioning.manifest.version=2\ndemo.setup.complete=true\n")
    assert example.run("-velmoraWait").report()["says"] == ["The platform runs, and was given:"]


def test_an_installer_provisions_whatever_the_level(example):
    example.offer_provisioning()
    example.run("-velmoraWait")
    installer = example.run("-velmoraWait", "-provManifest", "a.manifest").report()
    assert (installer["level of the user"], installer["level wanted"]) == (["1"], ["1"])
    assert installer["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-provManifest", "a.manifest"]


def test_an_incomplete_set_up_gets_the_words_of_the_initial_extension(example):
    example.configure("config.initial.1", "-initialCompleteFlag")
    example.configure("config.initial.2", "demo.setup.complete")
    report = example.run("-velmoraWait", "-hello").report()
    assert report["arguments"] == ["--launcher.suppressErrors", "-initialCompleteFlag", "demo.setup.complete"]
    with open(USER_PROPERTIES, "a", encoding="utf-8") as file:
        file.write("demo.setup.complete=true\n")
    assert example.run("-velmoraWait", "-hello").report()["arguments"] == [
        "--launcher.suppressErrors", "-velmoraWait", "-hello"]
