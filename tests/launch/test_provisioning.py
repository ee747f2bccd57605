"""The provisioning launch: before a user's first platform, on a new level, and for an installer."""

import os
import re
import shutil

import pytest

from world import (CONFIG, ECLIPSE, HEAD, INSTALL_AREA, JAVA, LOCK, LOG, MAIN, PROPERTIES, STARTUP, TEMP_LOG, USER_PROPERTIES,
                   WORKSPACE, areas, lines, read, system, tree, until, user_logs)

LEVEL = "provisioning.manifest.version="
PROVISIONING = ["provisioning=true", "provisioning.application=org.prov", LEVEL + "2"]
BEGIN = "QVMRL0129I: ===== Begin Provisioning Parameters ====="
END = "QVMRL0130I: ===== End Provisioning Parameters ====="
RELEASED = "QVMRL0306I: lock file released @ "
NO_FORK = ["-e", "trace=clone,clone3,fork,vfork", "-e", "inject=clone,clone3,fork,vfork:error=EAGAIN"]
# The child that failed flushes its streams and ends while the launcher is about to write into the lock file.
AT_ONCE = ["-P", LOCK, "-e", "trace=flock,pwrite64,lseek,_llseek", "-e", "inject=flock:delay_enter=50000", "-e",
           "inject=pwrite64:delay_enter=150000", "-e", "inject=lseek,_llseek:delay_exit=150000"]


def install(world, *more, configuration="user", level=None, base=()):
    """An installation of level 2 that provisions; the users' level, when it has one, comes from its copies."""
    world.install(configuration, *PROVISIONING, *more)
    world.base_properties(*([] if level is None else [LEVEL + level]), *base)


def provisioning(*platform, user=True, configuration="user", vm=(), jvm=()):
    """The command of a provisioning run."""
    return (HEAD + list(platform) + areas() + ["-application", "org.prov"] + ["-userProvLaunch"] * user + list(vm)
            + STARTUP + list(jvm) + system(configuration=configuration) + INSTALL_AREA)


def ordinary(*platform, more=(), jvm=()):
    return HEAD + list(platform) + areas() + list(more) + STARTUP + list(jvm) + system() + INSTALL_AREA


def commands(world):
    return [platform.argv for platform in world.platforms()]


def provisions(world, *words):
    """Does the next start of this area provision? It does one or the other."""
    before = len(world.platforms())
    assert world.run(*words).status == 0
    until(lambda: not world.strangers(), "what was started has ended")
    (argv,) = commands(world)[before:]
    assert argv in (provisioning(*words), provisioning(*words, user=False), ordinary(*words))
    return argv != ordinary(*words)


def settled(world):
    """An area in which everything has been made, of a user of level 2."""
    install(world, level="2")
    assert provisions(world)
    assert not provisions(world)


# ---- the story of a user

def test_provisioning_and_then_the_platform(world):
    """The first start provisions and ends; the application has written the level and the flag of completion, so the
    second starts the platform; a new level of the installation provisions once more."""
    install(world, "config.initial.1=-initialCompleteFlag", "config.initial.2=init.done")
    world.plan("append", USER_PROPERTIES, lines(LEVEL + "2", "init.done=true"), start=0)
    world.run("-foo")
    world.run("-velmoraWait", "-foo")
    properties = read("/mnt/app/rcp/velmora.properties").replace(LEVEL + "2", LEVEL + "3")
    world.write("/mnt/app/rcp/velmora.properties", properties)
    world.run("-foo")
    assert commands(world) == [provisioning("-foo"), ordinary("-velmoraWait", "-foo"), provisioning("-foo")]


def test_without_the_written_level_every_start_provisions(world):
    """Until the user's properties have one, whatever else is there."""
    install(world)
    assert [provisions(world) for _ in range(3)] == [True, True, True]
    with open(USER_PROPERTIES, "a") as file:
        file.write(LEVEL + "2\n")
    assert not provisions(world)


def test_the_launcher_waits_for_the_provisioning_and_holds_the_lock(world):
    """The control files name the child meanwhile; a second launcher waits, and finds the level written."""
    install(world)
    world.plan("append", USER_PROPERTIES, LEVEL + "2\n", "wait", start=0)
    first = world.start()
    child = world.platform()
    until(lambda: read(LOCK) == "%d          " % child.pid, "the lock file names the child")
    assert read(MAIN) == "%d    " % child.pid
    second = world.start("-second")
    until(lambda: "-> FLOCK" in read("/proc/locks"), "the second waits for the lock")
    assert first.running() and second.running() and len(world.platforms()) == 1
    child.end()
    assert (first.wait().status, second.wait().status) == (0, 0)
    assert commands(world) == [provisioning(), ordinary("-second")]


def test_the_status_of_the_application_does_not_matter(world):
    install(world)
    world.plan("exit", 77)
    assert world.run().status == 0
    assert len(world.platforms()) == 1


def test_a_console_does_not_matter_either(world):
    """Nor does a word to wait: the launcher waits in any case and starts nothing more."""
    install(world)
    world.plan("sleep", 100)
    assert world.run("-console", "-velmoraWait").status == 0
    assert commands(world) == [provisioning("-console", "-velmoraWait")]


# ---- the command

def test_every_group_of_a_provisioning_command(world):
    """The application and its word stand between the platform's options and the VM."""
    install(world, "jvm.location=" + JAVA, "product=org.prod", "osgi.splashPath=file:/s", base=[
        "application=org.app", "personality=org.pers", "plugincustomization=/c.ini", "cp=/cp.jar", "-Dfoo=bar",
        "-Xmx 1g", "vmarg.a=-A", "vmfix.noconsole=-Dlog=x"])
    world.run("-foo", "-vmargs", "-Xown")
    assert commands(world) == [[
        ECLIPSE, "--launcher.suppressErrors", "-foo", "-data", WORKSPACE, "-configuration", CONFIG,
        "-application", "org.app", "-plugincustomization", "/c.ini", "-product", "org.prod", "-personality", "org.pers",
        "-application", "org.prov", "-userProvLaunch", "-vm", JAVA, *STARTUP, "-Xown", "-Dlog=x", "-A",
        "-Drcp.home=/mnt/app", "-Drcp.data=" + WORKSPACE, "-Dosgi.splashPath=file:/s",
        "-Dcom.vantor.rcp.install.id=abc", "-Drcp.install.config=user", "-Dfoo=bar",
        "-Drcp.osgi.install.area=/mnt/app/rcp/eclipse", "-Xmx1g", "-cp", "/cp.jar"]]


def test_the_application_is_named_as_it_stands(world):
    """Placeholders of the installation's own properties are not resolved."""
    install(world)
    world.properties(*(line.replace("org.prov", "${rcp.home}") for line in read(PROPERTIES).splitlines()))
    world.run()
    assert commands(world) == [[word.replace("org.prov", "${rcp.home}") for word in provisioning()]]


def test_a_vm_that_is_a_library_needs_no_fix(world):
    install(world, "jvm.location=/mnt/x.ee", base=["vmfix.noconsole=-Dfix"])
    world.run()
    assert commands(world) == [provisioning(vm=["-vm", "/mnt/x.ee"])]


@pytest.mark.parametrize("share, given", [
    ("vmarg.Dshare=-Xshareclasses:name=x", ["-Xshareclasses=none"]),
    ("vmarg.Dshare=", ["-Xshareclasses=none"]),
    ("vmarg.dshare=-Xshareclasses:name=x", ["-Xshareclasses:name=x"]),
    ("other=1", []),
])
def test_shared_classes_are_turned_off(world, share, given):
    """When there are any."""
    install(world, base=[share])
    world.run()
    assert commands(world) == [provisioning(jvm=given)]


def test_shared_classes_of_the_line_are_turned_off_too(world):
    install(world)
    world.run("vmarg.Dshare=-mine")
    assert commands(world) == [provisioning(jvm=["-Xshareclasses=none"])]


def test_shared_classes_of_an_old_level_are_removed(world):
    """Before the application starts, which is the first to see the new level."""
    install(world, base=["jvm.shareclasses.fullpath=/mnt/cache"])
    world.write("/mnt/cache/a")
    world.write("/mnt/cache/sub/b")
    world.run()
    assert commands(world) == [provisioning()]
    assert tree("/mnt/cache") == [] and os.path.isdir("/mnt/cache")


def test_the_platform_has_its_shared_classes(world):
    install(world, level="2", base=["vmarg.Dshare=-Xshareclasses:name=x"])
    world.run()
    world.run()
    assert commands(world)[1] == ordinary(jvm=["-Xshareclasses:name=x"])


def test_what_a_provisioning_run_logs(world):
    """Its parameters always, those of a platform not at all."""
    install(world)
    world.run()
    log = read(LOG).splitlines()
    assert log[log.index(BEGIN):log.index(END) + 1] == [BEGIN, *provisioning(), END]
    assert [line for line in log if line[:10] in ("QVMRL0132I", "QVMRL0133I", "QVMRL0076I", "QVMRL0120I")] == []
    assert log[-1].startswith("QVMRL0306I: lock file released @ ")


@pytest.mark.parametrize("base, line", [
    ([], 'QVMRL0121I: "vmarg.Dshare" shared classes property was not detected. No special action needed while '
         'provisioning'),
    (["vmarg.Dshare=-x"], 'QVMRL0120I: "vmarg.Dshare" shared classes property found. Setting -Xsharedclasses=none '
                          'while provisioning'),
])
def test_what_a_traced_provisioning_run_tells(world, base, line):
    """The option is spelled differently from the value that is set."""
    install(world, base=base)
    world.run("-debug")
    log = read(user_logs()[0]).splitlines()
    at = log.index("QVMRL0076I: Detected platform initial launch or user initial launch. Executing platform "
                   "provisioning.")
    assert log[at - 1] == line


@pytest.mark.parametrize("left, how", [(None, None), ("4194303          ", None), ("4194303          ", AT_ONCE)])
def test_an_executable_that_cannot_be_started(world, left, how):
    """The start ends as after a provisioning, with status 0, and says why; the lock is free again. The child that
    failed ends like a launcher, and releases the lock as well, perhaps while it is being recorded. What an earlier
    platform left in the lock file, whose number no process has, is in the way of neither."""
    install(world)
    world.write(ECLIPSE, "no program", 0o755)
    if left is not None:
        world.write(LOCK, left)
    assert world.run(strace=how).status == 0
    assert world.platforms() == []
    log = read(LOG).splitlines()
    told = log[log.index(END) + 1:]
    assert sorted(line[:len(RELEASED)] for line in told if line.startswith("QVMRL")) == [RELEASED] * 2
    assert [line for line in told if not line.startswith("QVMRL")] == [
        "Unable to execute %s : Exec format error" % ECLIPSE]
    (child,) = re.findall(r"^(\d+)    $", read(MAIN))
    assert read(LOCK) == child + " " * max(10, len(left or "") - len(child))
    world.stand_in(ECLIPSE)
    assert provisions(world)


def test_a_fork_that_fails(world):
    """The start ends as after a provisioning; nobody is recorded, and the lock is released once, by the launcher."""
    install(world)
    assert world.run(strace=NO_FORK).status == 0
    assert world.platforms() == []
    log = read(LOG).splitlines()
    error, released = log[log.index(END) + 1:]
    assert error.endswith(" : Resource temporarily unavailable")
    assert released.startswith(RELEASED)
    assert (read(LOCK), os.path.exists(MAIN)) == ("", False)
    assert provisions(world)


def test_a_command_that_cannot_be_built(world):
    install(world, "eclipse.name=gone")
    world.fatal(world.run(), "QVMRL0007E: /mnt/app/base/linux/x86/gone is not executable or does not exist.",
                "No such file or directory")


# ---- when it is due

@pytest.mark.parametrize("value", ["TRUE", "True", "true1", "tru", "", "1", "yes", "true\\t", "true\t", "${env.T}"])
def test_only_the_exact_word_enables_it(world, value):
    """Not in upper case, and with nothing behind it; a placeholder in it is not resolved."""
    world.install("user", *PROVISIONING[1:], "provisioning=" + value)
    world.run(env={"T": "true"})
    assert commands(world) == [ordinary()]


def test_a_blank_behind_the_word_is_not_part_of_the_value(world):
    """The reader of properties takes it off."""
    world.install("user", *PROVISIONING[1:], "provisioning=true ")
    world.run()
    assert commands(world) == [provisioning()]


def test_without_the_word_there_is_none(world):
    world.install("user", *PROVISIONING[1:])
    world.run()
    assert commands(world) == [ordinary()]


@pytest.mark.parametrize("configuration", ["user", "multiuser", "lockdown"])
def test_the_configurations_that_provision(world, configuration):
    """In lockdown too it is one run, and then the launcher ends."""
    install(world, configuration=configuration)
    assert world.run().status == 0
    assert commands(world) == [provisioning(configuration=configuration)]


@pytest.mark.parametrize("words", [[], ["-velmoraWait", "-provManifest"]])
@pytest.mark.parametrize("configuration", ["userpb", "serial.multiuser"])
def test_the_configurations_that_do_not(world, configuration, words):
    """Not even for an installer."""
    install(world, configuration=configuration)
    assert world.run(*words).status == 0
    assert commands(world) == [
        HEAD + words + areas() + STARTUP + system(configuration=configuration) + INSTALL_AREA]


@pytest.mark.parametrize("words", [[], ["-velmoraWait", "-provManifest"]])
def test_a_service_does_not(world, words):
    install(world, "jvm.location=" + JAVA, configuration="service")
    world.stand_in(JAVA)
    assert world.run(*words).status == 0
    (argv,) = commands(world)
    assert argv[0] == JAVA and "-userProvLaunch" not in argv and "org.prov" not in argv


def test_equal_levels_and_an_area_that_is_there(world):
    """And no installer: no provisioning."""
    settled(world)


@pytest.mark.parametrize("user, due", [
    ("2", False), ("1", True), ("3", True), ("02", True), ("2.0", True), ("", True), (" 2 ", False)])
def test_levels_are_compared_exactly(world, user, due):
    """As texts, older or newer; blanks around them belong to the file."""
    settled(world)
    world.write(USER_PROPERTIES, read(USER_PROPERTIES).replace(LEVEL + "2", LEVEL + user))
    assert provisions(world) == due


def test_a_level_is_compared_as_it_stands_in_the_file(world):
    """A placeholder in it is not resolved yet. It is when the shared classes are asked about, so these stay: by then
    the level is the installation's."""
    install(world, level="${env.L}", base=["jvm.shareclasses.fullpath=/mnt/cache"])
    world.write("/mnt/cache/a")
    for _ in range(2):
        assert world.run("-velmoraWait", env={"L": "2"}).status == 0
    assert commands(world) == [provisioning("-velmoraWait")] * 2
    assert tree("/mnt/cache") == ["0644 a"]


def test_the_level_may_be_the_jvms(world):
    """Its properties are the user's last ones."""
    install(world)
    assert provisions(world)
    world.jvm_properties(LEVEL + "2")
    assert not provisions(world)


def test_a_level_that_the_installation_lacks(world):
    """The user has one, so they differ."""
    settled(world)
    properties = read("/mnt/app/rcp/velmora.properties")
    world.write("/mnt/app/rcp/velmora.properties", properties.replace(LEVEL + "2\n", ""))
    assert provisions(world)


def test_a_level_on_neither_side(world):
    """Without one the user has never been provisioned."""
    world.install("user", *PROVISIONING[:2])
    assert [provisions(world) for _ in range(2)] == [True, True]


def test_a_program_name_that_is_a_named_argument(world):
    """It goes where named arguments go, and no word at all is left to be looked at."""
    install(world)
    assert world.run(argv0="vmarg.a=b").status == 0
    assert commands(world) == [provisioning(jvm=["b"])]


@pytest.mark.parametrize("missing, due", [
    ("logs", True),
    ("applications/eclipse/features", True),
    ("applications/eclipse/plugins", True),
    (".config/config.ini", True),
    (".config/rcpinstall.properties", True),
    (".config/org.eclipse.update/platform.xml", True),
    (".config/org.eclipse.update", True),
    (".config", True),
    ("", True),
    (".config/args.properties", False),
    (".rcp.lock", False),
    ("logs/shutdown.log", False),
])
def test_what_had_to_be_made_makes_it_a_first_start(world, missing, due):
    """A folder of the user's area, or a copy that is made once; not what every start writes."""
    settled(world)
    path = os.path.join(WORKSPACE, missing)
    shutil.rmtree(path) if os.path.isdir(path) else os.unlink(path)
    assert provisions(world) == due


def test_a_reset_provisions_again(world):
    """The copies are made anew; the word for it does not reach the application."""
    settled(world)
    world.run("-resetconfig")
    assert commands(world)[-1] == provisioning()


def test_a_missing_application(world):
    """Its option stands before an empty word."""
    world.install("user", "provisioning=true")
    world.run()
    expected = provisioning()
    expected[expected.index("org.prov")] = ""
    assert commands(world) == [expected]


def test_a_missing_flag_is_not_asked_for_before_the_platform_is_due(world):
    """A provisioning run comes before a damaged group of initial words is noticed."""
    install(world, "config.initial.1=-x")
    assert world.run().status == 0
    assert commands(world) == [provisioning()]
    with open(USER_PROPERTIES, "a") as file:
        file.write(LEVEL + "2\n")
    assert world.run().status == 255
    assert "QVMRL0115E: Invalid config.initial arguments. -initialCompleteFlag not found" in read(LOG)
    assert len(commands(world)) == 1


# ---- for an installer

INSTALLER = ["-velmoraWait", "-provManifest"]


def test_an_installers_run(world):
    """It provisions although nothing is new, and without the word for a user's run; then the launcher ends."""
    settled(world)
    assert world.run(*INSTALLER).status == 0
    assert commands(world)[2:] == [provisioning(*INSTALLER, user=False)]


def test_an_installers_first_run(world):
    install(world)
    assert world.run("-provManifest", "-velmoraWait").status == 0
    assert commands(world) == [provisioning("-provManifest", "-velmoraWait", user=False)]


def test_an_installers_words_may_come_from_an_extension(world):
    """They count like those of the line."""
    install(world, "config.i.1=-velmoraWait", "config.i.2=-provManifest", level="2")
    assert provisions(world)
    assert not provisions(world)
    assert world.run("-config", "i").status == 0
    assert commands(world)[2:] == [provisioning(*INSTALLER, user=False)]


@pytest.mark.parametrize("word", INSTALLER)
def test_one_of_the_two_words_alone(world, word):
    """No installer's run: an ordinary start of a settled area, a user's run of a new one."""
    install(world, level="2")
    world.run(word)
    world.run(word)
    assert commands(world) == [provisioning(word), ordinary(word)]


def test_an_installer_is_refused_while_a_platform_lives(world):
    """Its number is in the message. Nothing of the area is touched."""
    settled(world)
    world.plan("wait")
    world.run()
    platform = world.platform(2)
    before = os.listdir(CONFIG)
    start = world.run(*INSTALLER)
    assert start.status == 255
    assert len(world.platforms()) == 3
    assert "\nQVMRL0122E: Attempting to install while process %d is running. : " % platform.pid in read(LOG)
    assert os.listdir(CONFIG) == before
    platform.end()
    world.plan()
    assert world.run(*INSTALLER).status == 0
    assert commands(world)[3:] == [provisioning(*INSTALLER, user=False)]


def test_the_installers_word_alone_is_refused_as_well(world):
    """Whatever else stands on the line, and in every configuration."""
    world.install("serial.multiuser")
    world.plan("wait")
    world.run()
    platform = world.platform()
    assert world.run("-provManifest").status == 255
    assert len(world.platforms()) == 1
    assert "QVMRL0122E: Attempting to install while process %d is running." % platform.pid in read(LOG)


def test_the_question_for_the_platform_is_not_the_reason(world):
    """The reason is errno as it stands: that of the last thing that was missing, long before the shell was asked."""
    settled(world)
    world.plan("wait")
    world.run()
    world.write(TEMP_LOG, "of an earlier start\n")
    assert world.run(*INSTALLER).status == 255
    assert read(LOG).endswith(" is running. : No such file or directory\n")
    assert not os.path.exists(TEMP_LOG)


def test_an_installers_word_of_an_extension_is_refused_as_well(world):
    world.install("user", "config.i.1=-provManifest")
    world.plan("wait")
    world.run()
    platform = world.platform()
    assert world.run("-config", "i").status == 255
    assert len(world.platforms()) == 1
    assert "\nQVMRL0122E: Attempting to install while process %d is running. : " % platform.pid in read(LOG)


def test_a_daemon_process_never_provisions(world):
    """Even in an area that is new to it."""
    install(world, level="2")
    provisions(world)
    world.plan("wait")
    world.run()
    main = world.platform(1)
    os.unlink(CONFIG + "/config.ini")
    assert world.run().status == 0
    assert commands(world)[2:] == [ordinary(more=["-useDaemon", str(main.pid)])]
