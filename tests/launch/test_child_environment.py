"""The environment that the platform inherits: the launcher's own, changed by the user's properties."""

import datetime
import os
import re

import pytest

from world import CONFIG, ECLIPSE, HOME, JAVA, LOG, WORKSPACE, read, system_time, tree, user_logs

INHERITED = {"HOME": HOME, "USER": "anna", "LC_ALL": "C.UTF-8", "PATH": "/usr/bin:/bin"}
LIBRARY = "/mnt/my lib/libx.so"
LINK = "/tmp/vantor.rcp.anna.abc.libx.so"


def environment(**changed):
    """The whole environment of a platform when nothing else is said: what was inherited, and the zip limit."""
    known = {**INHERITED, "JAVA_HIGH_ZIPFDS": "500", **changed}
    return {name: value for name, value in known.items() if value is not None}


def started(world, *properties, words=(), env=None):
    """The environment that comes of these lines of the user's properties."""
    world.install()
    world.base_properties(*properties)
    assert world.run(*words, env=env).status == 0
    return world.only_platform().env


# ---- the library path

OFF = None
# library.path.prepend, the internal path, library.path.append; LD_LIBRARY_PATH without an inherited one, and with
# "/i". The launcher records the inherited one under the internal path's name, where an absent one finds it.
LIBRARY_PATHS = [
    (OFF, OFF, OFF, OFF, "/i"),
    (OFF, OFF, "", OFF, "/i"),
    (OFF, OFF, "/b", "/b", "/i:/b"),
    (OFF, "", OFF, OFF, "/i"),
    (OFF, "", "", OFF, "/i"),
    (OFF, "", "/b", "/b", "/b"),
    (OFF, "/c", OFF, OFF, "/i"),
    (OFF, "/c", "", OFF, "/i"),
    (OFF, "/c", "/b", "/c:/b", "/c:/b"),
    ("", OFF, OFF, OFF, "/i"),
    ("", OFF, "", OFF, "/i"),
    ("", OFF, "/b", "/b", "/i:/b"),
    ("", "", OFF, OFF, "/i"),
    ("", "", "", OFF, "/i"),
    ("", "", "/b", "/b", "/b"),
    ("", "/c", OFF, OFF, "/i"),
    ("", "/c", "", OFF, "/i"),
    ("", "/c", "/b", "/c:/b", "/c:/b"),
    ("/a", OFF, OFF, "/a", "/a:/i"),
    ("/a", OFF, "", "/a", "/a:/i"),
    ("/a", OFF, "/b", "/a:/b", "/a:/i:/b"),
    ("/a", "", OFF, "/a", "/a"),
    ("/a", "", "", "/a", "/a"),
    ("/a", "", "/b", "/a:/b", "/a:/b"),
    ("/a", "/c", OFF, "/a:/c", "/a:/c"),
    ("/a", "/c", "", "/a:/c", "/a:/c"),
    ("/a", "/c", "/b", "/a:/c:/b", "/a:/c:/b"),
]


@pytest.mark.parametrize("prepend, internal, append, alone, with_inherited", LIBRARY_PATHS)
def test_the_library_path(world, prepend, internal, append, alone, with_inherited):
    """Put in front, internal, appended, joined with colons. The internal one alone sets nothing; an empty value counts
    as absent; what was inherited is replaced, not extended."""
    keys = ("library.path.prepend", "com.vantor.rcp.core.internal.librarypath", "library.path.append")
    world.install()
    world.base_properties(*("%s=%s" % pair for pair in zip(keys, (prepend, internal, append)) if pair[1] is not None))
    world.run("-velmoraWait")
    world.run("-velmoraWait", env={"LD_LIBRARY_PATH": "/i"})
    world.run("-velmoraWait", env={"LD_LIBRARY_PATH": ""})
    assert [platform.env for platform in world.platforms()] == [
        environment(LD_LIBRARY_PATH=alone),
        environment(LD_LIBRARY_PATH=with_inherited),
        environment(LD_LIBRARY_PATH="" if alone is None else alone)]


def test_the_rows_are_all_combinations():
    assert len(set(row[:3] for row in LIBRARY_PATHS)) == 27


def test_the_library_path_does_not_grow_with_every_restart(world):
    """A restart inherits the path that was made for the platform, and writes no record; the recorded one counts."""
    world.install()
    world.base_properties("library.path.prepend=/a")
    world.run("-velmoraWait", env={"LD_LIBRARY_PATH": "/i"})
    world.run("-velmoraWait", "-restart", env={"LD_LIBRARY_PATH": "/a:/i"})
    assert [platform.env["LD_LIBRARY_PATH"] for platform in world.platforms()] == ["/a:/i", "/a:/i"]


def test_a_restart_without_a_record_has_no_internal_path(world):
    """And nobody misses the record."""
    world.install()
    world.base_properties("library.path.prepend=/a")
    world.run("-restart", env={"LD_LIBRARY_PATH": "/i"})
    assert world.only_platform().env == environment(LD_LIBRARY_PATH="/a")


# ---- the zip limit

@pytest.mark.parametrize("properties, inherited, limit", [
    ([], None, "500"),
    ([], "7", "500"),
    (["env.JAVA_HIGH_ZIPFDS=1000"], None, "1000"),
    (["env.JAVA_HIGH_ZIPFDS=1000"], "7", "1000"),
    (["env.JAVA_HIGH_ZIPFDS="], "7", ""),
    (["env.set.JAVA_HIGH_ZIPFDS=3"], None, "500"),
    (["env.unset.JAVA_HIGH_ZIPFDS="], "7", "500"),
])
def test_the_zip_limit(world, properties, inherited, limit):
    """500 when no property gives it, whatever is inherited, set or removed."""
    assert started(world, *properties, env={"JAVA_HIGH_ZIPFDS": inherited}) == environment(JAVA_HIGH_ZIPFDS=limit)


# ---- variables that are set and removed

def test_removals_come_before_settings(world):
    """Whatever the order in the file, a variable that is named in both ends up set."""
    assert started(world, "env.set.A=1", "env.unset.A=", "env.unset.B=", "env.set.B=2", "env.unset.C=x",
                   env={"A": "a", "B": "b", "C": "c", "D": "d"}) == environment(A="1", B="2", D="d")


def test_a_variable_is_set_and_another_removed(world):
    """"env.unset.PATH2" removes PATH2; "env.set.FOO" with the value 1 sets FOO to 1, over what was there."""
    assert started(world, "env.unset.PATH2=", "env.set.FOO=1",
                   env={"PATH2": "x", "FOO": "old"}) == environment(FOO="1")


def test_the_last_of_two_settings_stays(world):
    """They are made in the order of the list."""
    assert started(world, "env.set.A=1", "env.set.A=2") == environment(A="2")


def test_a_variable_may_be_set_to_nothing(world):
    assert started(world, "env.set.A=", "env.set.B") == environment(A="", B="")


def test_the_name_begins_at_a_fixed_place(world):
    """Whatever stands in the eighth or tenth place."""
    assert started(world, "env.setXFOO=1", "env.unsetXBAR=", env={"BAR": "b"}) == environment(FOO="1")


@pytest.mark.parametrize("key", ["env.set", "env.set.", "env.unset", "env.unset."])
def test_a_key_without_a_name_has_no_effect(world, key):
    assert started(world, key + "=1", env={"A": "a"}) == environment(A="a")


def test_an_equals_sign_never_belongs_to_a_name(world):
    """A backslash does not keep it from ending the key, so it stands in the value."""
    assert started(world, "env.set.A\\=B=1", "env.unset.C\\=D=", "env.set.E=5",
                   env={"C": "c"}) == environment(A="B=1", E="5")


def test_the_settings_end_at_an_empty_key(world):
    assert started(world, "env.set.A=1", "=x", "env.set.B=2") == environment(A="1")


def test_values_may_hold_the_environment(world):
    """Placeholders have been resolved by then."""
    assert started(world, "env.set.PATH=/opt/bin:${env.PATH}", "env.set.W=${workspace.location}") == environment(
        PATH="/opt/bin:/usr/bin:/bin", W=WORKSPACE)


def test_a_setting_replaces_the_library_path_that_was_built(world):
    """The path is set first."""
    assert started(world, "library.path.prepend=/a", "env.set.LD_LIBRARY_PATH=/mine") == environment(
        LD_LIBRARY_PATH="/mine")


def test_names_and_values_in_the_locales_encoding(world):
    assert started(world, "env.set.GRÖSSE=groß €") == environment(GRÖSSE="groß €")


@pytest.mark.parametrize("configuration, more", [
    ("user", []),
    ("user", ["provisioning=true", "provisioning.application=org.prov"]),
    ("service", ["jvm.location=" + JAVA]),
])
def test_every_order_of_the_command_has_the_environment(world, configuration, more):
    """The ordinary start, a provisioning run, and the JVM itself as the program."""
    world.install(configuration, *more)
    world.base_properties("library.path.append=/b", "library.preload=/mnt/lib/libx.so", "env.set.A=1", "env.unset.B=",
                          "env.JAVA_HIGH_ZIPFDS=9")
    world.stand_in(JAVA)
    world.run(env={"B": "b"})
    platform = world.only_platform()
    assert platform.env == environment(LD_LIBRARY_PATH="/b", LD_PRELOAD="/mnt/lib/libx.so", A="1",
                                       JAVA_HIGH_ZIPFDS="9")
    assert platform.exe == (JAVA if configuration == "service" else ECLIPSE)
    assert ("-userProvLaunch" in platform.argv) == ("provisioning=true" in more)


def test_a_daemon_process_gives_its_platform_the_same(world):
    """The internal path is the one that the main process recorded."""
    world.install()
    world.base_properties("library.path.append=/b", "env.set.A=1")
    world.plan("wait")
    world.run(env={"LD_LIBRARY_PATH": "/main"})
    world.platform()
    world.run(env={"LD_LIBRARY_PATH": "/daemon"})
    first, second = world.platforms()
    assert "-useDaemon" in second.argv
    assert first.env == second.env == environment(LD_LIBRARY_PATH="/main:/b", A="1")


@pytest.mark.parametrize("line, inherited, before, after", [
    ("env.set.TZ=XXX-11", "AAA0", 0, 11),
    ("env.set.TZ=XXX-11", None, None, 11),
    ("env.unset.TZ=", "XXX+11", -11, None),
])
def test_a_time_zone_is_that_of_the_log_from_then_on(world, line, inherited, before, after):
    """The lock is had before the platform's environment is made, and released after it."""
    started(world, line, env={"TZ": inherited} if inherited else {})
    for hours, text in ((before, "QVMRL0303I: lock file captured"), (after, "QVMRL0306I: lock file released")):
        stamp = re.search(text + r" @ (\d{8}_\d{6})_\d{3}\n", read(LOG)).group(1)
        here = system_time() if hours is None else datetime.datetime.utcnow() + datetime.timedelta(hours=hours)
        assert abs(datetime.datetime.strptime(stamp, "%Y%m%d_%H%M%S") - here) < datetime.timedelta(minutes=10), text


# ---- the library to preload

def test_a_library_without_a_blank_is_named_directly(world):
    """Also one that is not there; no link is made."""
    assert started(world, "library.preload=/opt/lib/libx.so", env={"LD_PRELOAD": ":"}) == environment(
        LD_PRELOAD="/opt/lib/libx.so")
    assert tree("/tmp") == []


def test_a_library_with_a_blank_is_reached_through_a_link(world):
    """In /tmp, named for the user, the install id and the library."""
    world.write(LIBRARY)
    assert started(world, "library.preload=" + LIBRARY) == environment(LD_PRELOAD=LINK)
    assert tree("/tmp") == ["vantor.rcp.anna.abc.libx.so -> /mnt/my lib/libx.so"]


def test_the_link_is_named_for_whoever_starts(world):
    world.write(LIBRARY)
    assert started(world, "library.preload=" + LIBRARY, env={"USER": "alice"}) == environment(
        USER="alice", LD_PRELOAD="/tmp/vantor.rcp.alice.abc.libx.so")
    assert tree("/tmp") == ["vantor.rcp.alice.abc.libx.so -> /mnt/my lib/libx.so"]


def test_the_link_of_a_user_with_a_domain(world):
    """The backslash is a part of its name; in the workspace it is a separator."""
    world.write(LIBRARY)
    link = "/tmp/vantor.rcp.DOM\\anna.abc.libx.so"
    assert started(world, "library.preload=" + LIBRARY, env={"USER": "DOM\\anna"}) == environment(
        USER="DOM\\anna", LD_PRELOAD=link)
    assert tree("/tmp") == ["vantor.rcp.DOM\\anna.abc.libx.so -> /mnt/my lib/libx.so"]
    assert os.path.exists(HOME + "/VANTOR/RCP/abc/DOM/anna/.config/config.ini")


def test_a_blank_in_the_librarys_own_name(world):
    """It stays in the link's name, and in the variable."""
    world.write("/mnt/lib/my x.so")
    assert started(world, "library.preload=/mnt/lib/my x.so") == environment(
        LD_PRELOAD="/tmp/vantor.rcp.anna.abc.my x.so")
    assert tree("/tmp") == ["vantor.rcp.anna.abc.my x.so -> /mnt/lib/my x.so"]


def made(path):
    """Which one it is, and when it was made; not when it was read, which a start does."""
    entry = os.lstat(path)
    return entry.st_ino, entry.st_mtime_ns, entry.st_ctime_ns


def test_a_link_to_the_library_is_kept(world):
    world.write(LIBRARY)
    world.link(LINK, LIBRARY)
    before = made(LINK)
    assert started(world, "library.preload=" + LIBRARY) == environment(LD_PRELOAD=LINK)
    assert made(LINK) == before


def test_a_link_to_another_library_is_replaced(world):
    world.write(LIBRARY)
    world.write("/mnt/other/libx.so")
    world.link(LINK, "/mnt/other/libx.so")
    assert started(world, "library.preload=" + LIBRARY) == environment(LD_PRELOAD=LINK)
    assert tree("/tmp") == ["vantor.rcp.anna.abc.libx.so -> /mnt/my lib/libx.so"]
    assert os.path.exists("/mnt/other/libx.so")


def test_a_dangling_link_counts_as_absent_and_stays_in_the_way(world):
    """No link can be made there; the variable names it all the same."""
    world.write(LIBRARY)
    world.link(LINK, "/mnt/gone/libx.so")
    assert started(world, "library.preload=" + LIBRARY) == environment(LD_PRELOAD=LINK)
    assert tree("/tmp") == ["vantor.rcp.anna.abc.libx.so -> /mnt/gone/libx.so"]


@pytest.mark.needs_root("a link of somebody else's")
def test_a_link_of_somebody_else_that_leads_elsewhere_is_named_all_the_same(world):
    """In /tmp nobody removes what is another's; that goes unsaid."""
    world.write(LIBRARY)
    world.write("/mnt/other/libx.so")
    world.link(LINK, "/mnt/other/libx.so")
    world.give(LINK, 0)
    assert started(world, "library.preload=" + LIBRARY, words=["-debug"]) == environment(LD_PRELOAD=LINK)
    assert tree("/tmp") == ["vantor.rcp.anna.abc.libx.so -> /mnt/other/libx.so"]
    assert told(world) == [
        "setPreload():found property: library.preload=" + LIBRARY,
        "setPreload():library name = libx.so",
        "setPreload():linkPath=" + LINK,
        "setPreload(): link path already exists.",
        "setPreload(): existing link is to: /mnt/other/libx.so",
        "setPreload(): removing existing link ...",
        "setPreload():setting LD_PRELOAD=" + LINK,
        "setPreload():getenv LD_PRELOAD=" + LINK]


def test_the_library_counts_not_a_setting_of_the_variable(world):
    """It is set last."""
    assert started(world, "env.set.LD_PRELOAD=/x", "library.preload=/opt/lib/libx.so") == environment(
        LD_PRELOAD="/opt/lib/libx.so")


def test_the_link_is_named_for_the_user_that_a_setting_gives(world):
    world.write(LIBRARY)
    assert started(world, "env.set.USER=bob", "library.preload=" + LIBRARY) == environment(
        USER="bob", LD_PRELOAD="/tmp/vantor.rcp.bob.abc.libx.so")
    assert tree("/tmp") == ["vantor.rcp.bob.abc.libx.so -> /mnt/my lib/libx.so"]


def test_a_library_with_a_blank_that_is_not_there_sets_nothing(world):
    """Not even a link; what was inherited stays."""
    assert started(world, "library.preload=" + LIBRARY, env={"LD_PRELOAD": ":"}) == environment(
        LD_PRELOAD=":")
    assert tree("/tmp") == []


def test_a_file_in_the_place_of_the_link_ends_the_start(world):
    """It has no target that could be read; the file stays."""
    world.install()
    world.base_properties("library.preload=" + LIBRARY)
    world.write(LIBRARY)
    world.write(LINK, "somebody's")
    world.fatal(world.run(), "QVMRL0184E: Getting command path failed! errno = 22", "Invalid argument")
    assert read(LINK) == "somebody's"


def test_a_relative_library_has_no_directory_to_take_its_name_from(world):
    world.install()
    world.base_properties("library.preload=my x.so")
    world.write("/mnt/my x.so")
    world.fatal(world.run(cwd="/mnt"), "QVMRL0189E: Couldn't find filename for library.preload property")


def test_a_relative_library_with_a_blank_that_is_not_there_is_no_trouble(world):
    assert started(world, "library.preload=my x.so") == environment()


def test_the_link_needs_the_users_name(world):
    """The workspace is named, so nothing asked for it before."""
    world.install()
    world.base_properties("library.preload=" + LIBRARY)
    world.write(LIBRARY)
    world.fatal(world.run("-data", "/mnt/w", env={"USER": None}), "QVMRL0006E: Couldn't find the user name!")
    assert tree("/tmp") == []


def test_a_library_without_a_blank_needs_no_users_name(world):
    assert started(world, "library.preload=/x.so", words=["-data", "/mnt/w"], env={"USER": None}) == environment(
        USER=None, LD_PRELOAD="/x.so")


def test_an_empty_library_is_set(world):
    assert started(world, "library.preload=") == environment(LD_PRELOAD="")


def told(world):
    """The lines of the traced log about the library to preload."""
    return [line for line in read(user_logs()[0]).splitlines() if line.startswith("setPreload()")]


def test_what_a_traced_start_tells_of_a_library(world):
    started(world, "library.preload=/opt/lib/libx.so", words=["-debug"])
    assert told(world) == ["setPreload():setting LD_PRELOAD=/opt/lib/libx.so"]


def test_what_a_traced_start_tells_of_a_new_link(world):
    world.write(LIBRARY)
    started(world, "library.preload=" + LIBRARY, words=["-debug"])
    assert told(world) == [
        "setPreload():found property: library.preload=" + LIBRARY,
        "setPreload():library name = libx.so",
        "setPreload():linkPath=" + LINK,
        "setPreload(): creating new link ...",
        "setPreload(): symlink() result = 0",
        "setPreload():setting LD_PRELOAD=" + LINK,
        "setPreload():getenv LD_PRELOAD=" + LINK]


def test_what_a_traced_start_tells_of_a_replaced_link(world):
    world.write(LIBRARY)
    world.link(LINK, "/mnt")
    started(world, "library.preload=" + LIBRARY, words=["-debug"])
    assert told(world) == [
        "setPreload():found property: library.preload=" + LIBRARY,
        "setPreload():library name = libx.so",
        "setPreload():linkPath=" + LINK,
        "setPreload(): link path already exists.",
        "setPreload(): existing link is to: /mnt",
        "setPreload(): removing existing link ...",
        "setPreload(): creating new link ...",
        "setPreload(): symlink() result = 0",
        "setPreload():setting LD_PRELOAD=" + LINK,
        "setPreload():getenv LD_PRELOAD=" + LINK]


def test_what_a_traced_start_tells_of_a_kept_link(world):
    world.write(LIBRARY)
    world.link(LINK, LIBRARY)
    started(world, "library.preload=" + LIBRARY, words=["-debug"])
    assert told(world) == [
        "setPreload():found property: library.preload=" + LIBRARY,
        "setPreload():library name = libx.so",
        "setPreload():linkPath=" + LINK,
        "setPreload(): link path already exists.",
        "setPreload(): existing link is to: " + LIBRARY,
        "setPreload():setting LD_PRELOAD=" + LINK,
        "setPreload():getenv LD_PRELOAD=" + LINK]


def test_the_result_of_a_link_that_cannot_be_made_is_told_as_0(world):
    """The number is not that of the call."""
    world.write(LIBRARY)
    world.link(LINK, "/mnt/gone")
    started(world, "library.preload=" + LIBRARY, words=["-debug"])
    assert told(world)[3:] == [
        "setPreload(): creating new link ...",
        "setPreload(): symlink() result = 0",
        "setPreload():setting LD_PRELOAD=" + LINK,
        "setPreload():getenv LD_PRELOAD=" + LINK]


def test_what_a_traced_start_tells_of_a_library_that_is_not_there(world):
    started(world, "library.preload=" + LIBRARY, words=["-debug"], env={"LD_PRELOAD": ":"})
    assert told(world) == [
        "setPreload():found property: library.preload=" + LIBRARY,
        "setPreload():getenv LD_PRELOAD=:"]


def test_the_launchers_own_record_is_where_the_internal_path_comes_from(world):
    world.install()
    world.base_properties("library.path.append=/b")
    world.run(env={"LD_LIBRARY_PATH": "/i"})
    assert read(CONFIG + "/args.properties").splitlines()[-1] == "com.vantor.rcp.core.internal.librarypath=/i"
    assert world.only_platform().env["LD_LIBRARY_PATH"] == "/i:/b"
