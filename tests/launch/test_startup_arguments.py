"""args.properties: the words of a start, recorded byte for byte so that the platform can restart the launcher."""

import os

import pytest

from contents import contents
from world import APP, CONFIG, LAUNCHER, WORKSPACE, areas, lines, read, read_bytes

RECORD = CONFIG + "/args.properties"


def record(*words, library_path="", program=LAUNCHER):
    """The whole file for these words, which are given as they are written."""
    entries = ["arg%d=%s" % (number, word) for number, word in enumerate([program, *words])]
    return lines(*entries, "argc=%d" % len(entries),
                 "com.vantor.rcp.core.internal.librarypath=" + library_path)


def recorded(world, *words, properties=(), config=CONFIG, **how):
    world.install("user", *properties)
    assert world.run(*words, **how).status == 0
    return read(config + "/args.properties")


# ---- which words

def test_a_start_without_words(world):
    assert recorded(world) == record()


def test_the_words_of_this_start_alone_are_left_out(world):
    """"-resetconfig", and "-rcp_old_pid" with its value; the workspace is recorded resolved."""
    assert recorded(world, "-resetconfig", "-data", "${rcp.home}/ws", "-rcp_old_pid", "4711", "-x",
                    config=APP + "/ws/.config") == record("-data", "/mnt/app/ws", "-x")


def test_only_the_first_of_each_is_left_out(world):
    assert recorded(world, "-resetconfig", "-rcp_old_pid", "1", "-resetconfig", "-rcp_old_pid", "2") == record(
        "-resetconfig", "-rcp_old_pid", "2")


def test_an_old_pid_without_a_value(world):
    assert recorded(world, "-x", "-rcp_old_pid") == record("-x")


def test_the_value_of_an_old_pid_is_skipped_whatever_it_is(world):
    """Then the value of the workspace stands without its option."""
    assert recorded(world, "-rcp_old_pid", "-data", "/mnt/w", config="/mnt/w/.config") == record("/mnt/w")


def test_words_that_only_look_like_them_are_recorded(world):
    assert recorded(world, "-Resetconfig", "-resetconfig2", "--restart", "-rcp_old_pid=1") == record(
        "-Resetconfig", "-resetconfig2", "--restart", "-rcp_old_pid\\=1")


def test_the_words_keep_their_order_behind_vmargs_too(world):
    assert recorded(world, "-b", "vmarg.a=-A", "-a", "-vmargs", "-Xmx1g", "-resetconfig", "-b") == record(
        "-b", "vmarg.a\\=-A", "-a", "-vmargs", "-Xmx1g", "-b")


def test_empty_words_are_words(world):
    assert recorded(world, "", "-x", "") == record("", "-x", "")


def test_more_than_ten_words(world):
    """In the order of the line, numbered without gaps."""
    words = ["-w%d" % number for number in range(120)]
    assert recorded(world, *words[:60], "-resetconfig", *words[60:]) == record(*words)


def test_the_program_is_recorded_by_its_full_path(world):
    """Whatever its first word says."""
    assert recorded(world, "-x", argv0="velmora", program=LAUNCHER) == record("-x")


def test_the_program_behind_a_link(world):
    world.install()
    world.link("/mnt/bin/start", LAUNCHER)
    assert world.run(program="/mnt/bin/start").status == 0
    assert read(RECORD) == record()


def test_a_program_that_stands_in_the_first_word_is_not_looked_at_as_an_option(world):
    """Named "-resetconfig", it is still the program."""
    assert recorded(world, "-x", argv0="-resetconfig") == record("-x")


# ---- the workspace

def test_the_separator_at_the_end_of_the_workspace_stays(world):
    """The workspace itself loses it."""
    assert recorded(world, "-data", "/mnt/w/", config="/mnt/w/.config") == record("-data", "/mnt/w/")
    assert areas("/mnt/w")[1] in world.only_platform().argv


def test_only_the_first_workspace_is_resolved(world):
    """And in it only the first placeholder for the installation."""
    # The later ones are standard placeholders, which are resolved when the record is read back.
    assert recorded(world, "-data", "${rcp.home}/w${rcp.home}", "-data", "${rcp.home}/x",
                    config="/mnt/app/w${rcp.home}/.config") == record(
                        "-data", "/mnt/app/w${rcp.home}", "-data", "${rcp.home}/x")


def test_placeholders_for_properties_and_the_environment_in_the_workspace(world):
    """The properties are those of the installation."""
    assert recorded(world, "-data", "${env.SOME}/${prop.rcp.install.id}/${env.NOSUCH,none}", env={"SOME": "/mnt/w"},
                    config="/mnt/w/abc/none/.config") == record("-data", "/mnt/w/abc/none")


def test_no_other_word_is_resolved(world):
    assert recorded(world, "${rcp.home}", "${env.HOME}", "-data", "/mnt/w", "${rcp.data}",
                    config="/mnt/w/.config") == record("${rcp.home}", "${env.HOME}", "-data", "/mnt/w", "${rcp.data}")


def test_a_relative_workspace_stays_relative(world):
    assert recorded(world, "-data", "mnt/w", cwd="/", config="/mnt/w/.config") == record("-data", "mnt/w")


def test_the_option_without_a_workspace(world):
    """As the last word it is recorded as it is, and nothing is resolved."""
    assert recorded(world, "${rcp.home}", "-data") == record("${rcp.home}", "-data")


# ---- escaping

def test_every_character_of_ascii_but_the_double_quote(world):
    """Special ones have a backslash, control characters and the delete character are escaped; a blank stays."""
    word = "".join(map(chr, range(1, 0x80))).replace('"', "")
    escaped = ("".join("\\u%04x" % code for code in range(1, 0x20))
               + " \\!\\#$%&'()*+,-./0123456789\\:;<\\=>?@ABCDEFGHIJKLMNOPQRSTUVWXYZ[\\\\]^_`abcdefghijklmnopqrstuvwxyz"
               + "{|}~\\u007f")
    assert recorded(world, word) == record(escaped)


@pytest.mark.parametrize("word, written", [
    (" both ends ", " both ends "),
    ("\ttab", "\\u0009tab"),
    ("two\nlines\r", "two\\u000alines\\u000d"),
    ("=:#!\\", "\\=\\:\\#\\!\\\\"),
    ("http://h/?a=b#c", "http\\://h/?a\\=b\\#c"),
    ("\x7f\x80\xa0", "\\u007f\\u0080\\u00a0"),
    ("größe €", "gr\\u00f6\\u00dfe \\u20ac"),
    ("Москва 東京", "\\u041c\\u043e\\u0441\\u043a\\u0432\\u0430 \\u6771\\u4eac"),
    ("\uffff", "\\uffff"),
    ("\U00010000", "\\u0000"),
    ("\U0001f600", "\\uf600"),
    ("\U0010ffff", "\\uffff"),
    ("100 %s %n %%", "100 %s %n %%"),
    ("\\u0041", "\\\\u0041"),
])
def test_escaped_words(world, word, written):
    """A character beyond sixteen bits keeps its low ones only."""
    assert recorded(world, word) == record(written)


def test_the_file_is_plain_ascii(world):
    recorded(world, "größe €", env={"LD_LIBRARY_PATH": "/größe"})
    assert read_bytes(RECORD).isascii()


def test_a_very_long_word(world):
    """It is written whole; only when it is read back is it cut into lines."""
    word = "x" * 100000
    assert recorded(world, word) == record(word)


@pytest.mark.parametrize("library_path, written", [
    (None, ""), ("", ""), ("/a", "/a"), ("/a:/b=c d", "/a\\:/b\\=c d"), ("/größe", "/gr\\u00f6\\u00dfe")])
def test_the_library_path_is_the_last_entry(world, library_path, written):
    """As this process sees it; empty when it is unset."""
    assert recorded(world, env={"LD_LIBRARY_PATH": library_path}) == record(library_path=written)


# ---- when it is written

def test_each_start_replaces_the_whole_file(world):
    world.install()
    world.run("-velmoraWait", "-a", "-long" * 1000)
    world.run("-velmoraWait")
    assert read(RECORD) == record("-velmoraWait")


def test_a_restart_writes_none(world):
    """Neither in a fresh area nor over an earlier one; all other files are made."""
    world.install()
    world.run("-velmoraWait", "-restart", "-x")
    assert sorted(contents(CONFIG)) == [
        "config.ini", "org.eclipse.update/", "org.eclipse.update/platform.xml", "rcpinstall.properties"]
    world.run("-velmoraWait", "-y")
    world.run("-velmoraWait", "-restart", "-z")
    assert read(RECORD) == record("-velmoraWait", "-y")
    assert len(world.platforms()) == 3


def test_a_daemon_process_leaves_that_of_the_main_process(world):
    world.install()
    world.plan("wait")
    world.run("-main")
    world.platform()
    before = os.stat(RECORD)
    world.run("-daemon")
    assert "-useDaemon" in world.platform(1).argv
    after = os.stat(RECORD)
    assert read(RECORD) == record("-main")
    assert (before.st_ino, before.st_mtime_ns) == (after.st_ino, after.st_mtime_ns)


def test_a_reset_writes_it_into_the_new_configuration(world):
    """Without the word for the reset; the old file is in the backup."""
    world.install()
    world.run("-velmoraWait", "-old")
    world.run("-velmoraWait", "-resetconfig", "-new")
    assert read(RECORD) == record("-velmoraWait", "-new")
    assert read(WORKSPACE + "/.configbak/args.properties") == record("-velmoraWait", "-old")


def test_it_is_written_before_the_command_is_built(world):
    """A start that fails later has recorded its words."""
    world.install("user", "eclipse.name=gone")
    assert world.run("-x").status == 255
    assert read(RECORD) == record("-x")


def test_refused_words_are_not_recorded(world):
    """They are refused before."""
    world.install()
    assert world.run('-x"').status == 255
    assert not os.path.exists(RECORD)


# ---- what is read back

def test_a_placeholder_in_a_word_that_cannot_be_resolved_ends_the_start(world):
    """The record is read back with the user's properties, whose placeholders must all have a value."""
    world.install()
    world.fatal(world.run("${env.NOSUCH}"), "QVMRL0088E: property substitution is invalid (${env.NOSUCH})")
    assert read(RECORD) == record("${env.NOSUCH}")


def test_recorded_words_are_values_for_placeholders(world):
    world.install()
    world.base_properties("-Dfirst=${prop.arg1}")
    world.run("-x")
    assert "-Dfirst=-x" in world.only_platform().argv


def test_a_record_that_cannot_be_read_is_passed_over_by_a_restart(world):
    """As a missing one is."""
    world.install()
    world.base_properties("-Dfirst=${env.NOSUCH,none}")
    world.write(RECORD, "arg1=${env.NOSUCH}\n", 0o000)
    assert world.run("-restart").status == 0
    assert "-Dfirst=none" in world.only_platform().argv


# ---- bad input

def test_a_folder_in_its_place(world):
    world.install()
    world.write(RECORD + "/mine", "x")
    world.fatal(world.run(), "QVMRL0097E: Could not open %s for writing!" % RECORD, "Is a directory")
    assert contents(RECORD) == {"mine": "x"}


def test_a_configuration_that_may_not_be_written_to(world):
    world.install()
    world.folder(CONFIG, 0o555)
    world.fatal(world.run(), "QVMRL0097E: Could not open %s for writing!" % RECORD, "Permission denied")
    assert contents(CONFIG) == {}


def test_a_record_that_may_not_be_written_to(world):
    """It stays as it is."""
    world.install()
    world.write(RECORD, "mine\n", 0o444)
    world.fatal(world.run(), "QVMRL0097E: Could not open %s for writing!" % RECORD, "Permission denied")
    assert read(RECORD) == "mine\n"


def test_a_link_in_its_place_is_written_through(world):
    """Also one that leads nowhere yet."""
    world.install()
    world.link(RECORD, "/mnt/elsewhere")
    assert world.run("-x").status == 0
    assert os.readlink(RECORD) == "/mnt/elsewhere"
    assert read("/mnt/elsewhere") == record("-x")


def full_disk(world, room, *words):
    """A start in a configuration that has room for so many bytes."""
    world.install()
    world.small_disk(CONFIG, room + 4096)
    world.write(CONFIG + "/filler", "x" * 4096)
    return world.run(*words)


def test_a_full_disk_during_the_words(world):
    world.fatal(full_disk(world, 4096, "x" * 100000), "QVMRL0020E: Error writing to %s file." % RECORD,
                "No space left on device")


def test_a_full_disk_that_shows_with_the_last_entry(world):
    """All entries were still in memory."""
    world.fatal(full_disk(world, 0, "-x"), "QVMRL0117E: Error writing to %s file." % RECORD,
                "No space left on device")


def test_after_a_full_disk_the_next_start_writes_it_whole(world):
    assert full_disk(world, 0, "-x").status == 255
    assert read(RECORD) == ""
    os.unlink(CONFIG + "/filler")
    world.run("-y")
    assert read(RECORD) == record("-y")
