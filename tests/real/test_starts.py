"""The ordinary starts: a user's first and second one, an extension, a service, a second launcher."""

import os
import pathlib

from example import (APP, BASE, CONFIG, JAVA, LAUNCHER, LOCK, LOG, PLUGINS, RECORDED_WORDS, USER_PROPERTIES, WORKSPACE,
                     ended, launched, lines, process_with, read, user_area)
from world import until

JVM_OPTIONS = ["-Xmx96m", "-XX:TieredStopAtLevel=1", "-XX:+UseSerialGC", "-XX:-UsePerfData"]


def test_the_platform_gets_everything_on_a_users_first_start(example):
    report = example.run("-velmoraWait").report()
    process = report.pop("process")
    assert report == {
        "says": ["The platform runs, and was given:"],
        "workspace": [WORKSPACE],
        "configuration area": [CONFIG],
        "rcp.home": [APP],
        "install id": ["demo-1"],
        "install config": ["user"],
        "JVM options": JVM_OPTIONS,
        "system properties": ["demo.greeting=plain", "demo.user=anna"],
        "environment": ["DEMO_SEASON=spring", "JAVA_HIGH_ZIPFDS=500"],
        "arguments": ["--launcher.suppressErrors", "-velmoraWait"],
    }
    assert read(LOCK) == process[0] + " " * 10
    assert read(WORKSPACE + "/.rcp.main") == process[0] + " " * 4


def test_the_native_command_is_logged_as_it_was_started(example):
    example.run("-velmoraWait")
    assert launched() == [
        BASE + "/linux/x86/eclipse",
        "--launcher.suppressErrors",
        "-velmoraWait",
        "-data", WORKSPACE,
        "-configuration", CONFIG,
        "-application", "velmora.demo.platform",
        "-vm", JAVA,
        "-startup", BASE + "/launcher.jar",
        "-vmargs",
        "-Ddemo.greeting=plain",
        "-Drcp.home=" + APP,
        "-Drcp.data=" + WORKSPACE,
        "-Dcom.vantor.rcp.install.id=demo-1",
        "-Drcp.install.config=user",
        "-Dosgi.install.area=" + APP + "/rcp/eclipse",
        "-Ddemo.user=anna",
        "-Drcp.osgi.install.area=" + APP + "/rcp/eclipse",
        *JVM_OPTIONS,
        "-cp", BASE + "/startup.jar",
    ]


def test_the_first_start_leaves_a_whole_user_area(example):
    example.run("-velmoraWait")
    assert user_area() == sorted([
        ".config/args.properties",
        ".config/config.ini",
        ".config/org.eclipse.update/platform.xml",
        ".config/rcpinstall.properties",
        ".rcp.lock",
        ".rcp.main",
        "applications/eclipse/features/",
        "applications/eclipse/plugins/",
        "logs/shutdown.log",
        "logs/velmora.log",
    ])
    assert read(CONFIG + "/config.ini") == read(BASE + "/config.ini")
    assert read(USER_PROPERTIES) == read(BASE + "/rcpinstall.properties") + lines(
        "rcp.install.id=demo-1",
        "vm=${rcp.home}/rcp/eclipse/plugins/velmora.demo.jvm/jre/bin/java",
        "rcp.base.location=${rcp.home}/rcp/eclipse/plugins/base",
        "install.configuration=user",
    )
    assert read(CONFIG + "/org.eclipse.update/platform.xml") == lines(
        '<?xml version="1.0" encoding="UTF-8"?>',
        '<config version="3.0">',
        '<site url="platform:/base/" enabled="true" updateable="true" policy="USER-EXCLUDE">',
        '<feature id="velmora.demo.jvm" version="1.0.0"/>',
        '<feature id="velmora.demo" version="1.0.0"/>',
        "</site>",
        "</config>",
    )
    assert read(RECORDED_WORDS) == lines(
        "arg0=" + LAUNCHER,
        "arg1=-velmoraWait",
        "argc=2",
        "com.vantor.rcp.core.internal.librarypath=",
    )
    assert 'QVMRL0077I: loading jvm.properties at "%s/velmora.demo.jvm/jvm.properties"\n' % PLUGINS in read(LOG)
    assert not os.listdir("/tmp")


def test_the_second_start_keeps_what_the_user_has(example):
    example.run("-velmoraWait")
    kept = [USER_PROPERTIES, CONFIG + "/config.ini", CONFIG + "/org.eclipse.update/platform.xml"]
    before = [(read(path), os.stat(path)) for path in kept]
    area = user_area()
    report = example.run("-velmoraWait", "-hello", "grüß dich").report()
    assert report["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-hello", "grüß dich"]
    assert [(read(path), os.stat(path).st_mtime_ns, os.stat(path).st_ino) for path in kept] == [
        (text, status.st_mtime_ns, status.st_ino) for text, status in before]
    assert user_area() == area
    assert read(LOCK) == report["process"][0] + " " * 10
    assert read(RECORDED_WORDS) == lines(
        "arg0=" + LAUNCHER,
        "arg1=-velmoraWait",
        "arg2=-hello",
        "arg3=gr\\u00fc\\u00df dich",
        "argc=4",
        "com.vantor.rcp.core.internal.librarypath=",
    )


def test_an_environment_variable_is_taken_from_the_platform(example):
    report = example.run("-velmoraWait", env={"DEMO_NOISE": "loud", "DEMO_SEASON": "winter"}).report()
    assert report["environment"] == ["DEMO_SEASON=spring", "JAVA_HIGH_ZIPFDS=500"]


def test_an_extension_adds_words_and_another_jvm_argument(example):
    report = example.run("-velmoraWait", "-config", "greeting").report()
    assert report["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-greeting", "Hello from the extension"]
    assert report["system properties"] == ["demo.greeting=extended", "demo.user=anna"]
    assert read(RECORDED_WORDS) == lines(
        "arg0=" + LAUNCHER,
        "arg1=-velmoraWait",
        "arg2=-config",
        "arg3=greeting",
        "argc=4",
        "com.vantor.rcp.core.internal.librarypath=",
    )


def test_the_command_line_wins_over_an_extension(example):
    report = example.run("-velmoraWait", "-config", "greeting", "vmarg.greeting=-Ddemo.greeting=typed").report()
    assert report["system properties"] == ["demo.greeting=typed", "demo.user=anna"]


def test_jvm_arguments_can_be_typed(example):
    report = example.run("-velmoraWait", "-hello", "-vmargs", "-Ddemo.typed=a b", "-Xss2m").report()
    assert report["system properties"] == ["demo.greeting=plain", "demo.typed=a b", "demo.user=anna"]
    assert report["JVM options"] == ["-Xss2m", *JVM_OPTIONS]
    assert report["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-hello"]


def test_the_platform_works_where_data_says(example):
    report = example.run("-velmoraWait", "-data", "${rcp.home}/my work/").report()
    assert report["workspace"] == [APP + "/my work"]
    assert report["configuration area"] == [APP + "/my work/.config"]


def test_a_service_starts_the_jvm_itself(example):
    example.configure("install.configuration", "service")
    workspace, configuration = APP + "/eclipse/.workspace", APP + "/eclipse/.config"
    report = example.run("-velmoraWait").report()
    process = report.pop("process")
    # The launcher archive keeps "-nosplash" for itself.
    assert report == {
        "says": ["The platform runs, and was given:"],
        "workspace": [workspace],
        "configuration area": [configuration],
        "rcp.home": [APP],
        "install id": ["demo-1"],
        "install config": ["service"],
        "JVM options": JVM_OPTIONS,
        "system properties": ["demo.greeting=plain", "demo.user=anna"],
        "environment": ["DEMO_SEASON=spring", "JAVA_HIGH_ZIPFDS=500"],
        "arguments": ["--launcher.suppressErrors", "-velmoraWait"],
    }
    assert launched(workspace + "/logs/velmora.log") == [
        JAVA,
        "-Ddemo.greeting=plain",
        "-Drcp.home=" + APP,
        "-Drcp.data=" + workspace,
        "-Dcom.vantor.rcp.install.id=demo-1",
        "-Drcp.install.config=service",
        "-Dosgi.install.area=" + APP + "/rcp/eclipse",
        "-Ddemo.user=anna",
        "-Drcp.osgi.install.area=" + APP + "/rcp/eclipse",
        *JVM_OPTIONS,
        "-cp", BASE + "/startup.jar",
        "org.eclipse.core.launcher.Main",
        "-nosplash",
        "--launcher.suppressErrors",
        "-velmoraWait",
        "-data", workspace,
        "-configuration", configuration,
        "-application", "velmora.demo.platform",
    ]
    assert read(workspace + "/.rcp.lock") == process[0] + " " * 10
    assert not os.path.exists(WORKSPACE)


def test_without_the_word_to_wait_the_launcher_leaves_the_platform_running(example):
    start = example.run("-demoStayUntil", "/mnt/leave")
    until(lambda: "arguments" in start.printed(), "the platform has printed")
    platform = int(start.report()["process"][0])
    assert platform == process_with("org.eclipse.core.launcher.Main")
    pathlib.Path("/mnt/leave").touch()
    ended(platform)


def test_a_second_launcher_finds_the_running_platform(example):
    first = example.run("-demoStayUntil", "/mnt/leave")
    until(lambda: "arguments" in first.printed(), "the first platform has printed")
    platform = first.report()["process"][0]
    recorded = read(RECORDED_WORDS)
    second = example.run("-velmoraWait", "-open", "a file").report()
    assert second["arguments"] == ["--launcher.suppressErrors", "-velmoraWait", "-open", "a file",
                                   "-useDaemon", platform]
    assert read(LOCK) == platform + " " * 10
    assert read(RECORDED_WORDS) == recorded
    pathlib.Path("/mnt/leave").touch()
    ended(int(platform))
    third = example.run("-velmoraWait").report()
    assert third["arguments"] == ["--launcher.suppressErrors", "-velmoraWait"]
    assert read(LOCK) == third["process"][0] + " " * 10
