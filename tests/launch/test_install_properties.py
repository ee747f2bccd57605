"""The user's rcpinstall.properties: the filtered lines of the installation's, and the block behind them."""

import os

import pytest

from world import (BASE, HEAD, INSTALL_AREA, LOG, STARTUP, USER_PROPERTIES, WORKSPACE, areas, lines, read, read_bytes,
                   system, tree, user_logs)

BLOCK = lines("rcp.install.id=abc", "rcp.base.location=${rcp.home}/base", "install.configuration=user")
MISSING = "QVMRL0008E: Unable to calculate necessary values for user specific rcpinstall.properties file."
NOT_OPEN = ("QVMRL0074E: Unable to open user specific rcpinstall.properties and temporary rcpinstall.properties files."
            "\n")


def copied(world, text):
    """What becomes of this base file, without the block."""
    world.install()
    world.write(BASE + "/rcpinstall.properties", text)
    assert world.run().status == 0
    result = read(USER_PROPERTIES)
    assert result.endswith(BLOCK)
    assert not os.path.lexists(USER_PROPERTIES + ".new")
    return result[:-len(BLOCK)]


def block(world, *properties):
    """The block of an installation with these properties more."""
    world.install("user", *properties)
    assert world.run().status == 0
    return read(USER_PROPERTIES)


# ---- the file of a later start

def later_start(world, *words):
    """A start whose user's file has one more line; how often it was opened, and how often the log has the line."""
    world.install("user", "config.a.1=-debug")
    assert world.run().status == 0
    world.all_ended()
    world.write(USER_PROPERTIES, read(USER_PROPERTIES) + "mine=1\n")
    before = set(user_logs())
    assert world.run(*words, strace=["-e", "trace=open,openat", "-P", USER_PROPERTIES]).status == 0
    log = "".join(read(name) for name in sorted(set(user_logs()) - before) or [LOG])
    return read("/dev/shm/strace").count("open"), log.count('QVMRL0032I: Prop Line = "mine=1"\n')


def test_a_later_start_reads_it_once(world):
    """For the install id and for all the rest."""
    assert later_start(world) == (1, 0)


@pytest.mark.parametrize("words", [["-debug"], ["-config", "a"]])
def test_a_traced_start_shows_it_in_both_places(world, words):
    """So it is read in both; in between it is looked for. A configuration may ask for the trace, too."""
    assert later_start(world, *words) == (3, 2)


# ---- the block

def test_the_block_alone(world):
    assert block(world) == BLOCK


def test_the_whole_block(world):
    """In its own order, behind what the installation's file has."""
    world.install()
    world.properties("com.vantor.rcp.core.bidi=on", "com.vantor.rcp.core.locale=de_CH", "install.configuration=user",
                     "rcp.base.location=${rcp.home}/base", "jvm.location=/mnt/jvm/bin/java", "rcp.install.id=abc",
                     "other=1")
    world.base_properties("p=1", "q=2")
    world.run()
    assert read(USER_PROPERTIES) == lines(
        "p=1",
        "q=2",
        "rcp.install.id=abc",
        "vm=/mnt/jvm/bin/java",
        "rcp.base.location=${rcp.home}/base",
        "install.configuration=user",
        "com.vantor.rcp.core.locale=de_CH",
        "com.vantor.rcp.core.bidi=on",
    )


@pytest.mark.parametrize("given, written", [
    (r"C\:\\jre\\bin", r"C\:/jre/bin"),
    (r"/mnt/a\=b\:c\#d!e", r"/mnt/a\=b\:c\#d\!e"),
    ("/mnt/a b", "/mnt/a b"),
    ("/mnt/é€\U0001f600~\x7f", r"/mnt/\u00e9\u20ac\uf600~\u007f"),
    ("/mnt/a\tb", r"/mnt/a\u0009b"),
    ("/mnt/$a{b}'", "/mnt/$a{b}'"),
])
def test_paths_are_written_escaped(world, given, written):
    """Backslashes have become slashes before; a character beyond 16 bits keeps its low half."""
    assert block(world, "jvm.location=" + given) == BLOCK.replace("abc\n", "abc\nvm=%s\n" % written)


def test_the_base_location_is_written_escaped(world):
    world.install()
    world.properties("rcp.install.id=abc", "install.configuration=user", "rcp.base.location=/mnt\\\\ä:b")
    world.write("/mnt/ä:b/rcpinstall.properties")
    world.write("/mnt/ä:b/config.ini")
    world.write("/mnt/ä:b/platform.xml")
    world.stand_in("/mnt/ä:b/linux/x86/eclipse")
    world.run()
    assert read_bytes(USER_PROPERTIES) == (b"rcp.install.id=abc\nrcp.base.location=/mnt/\\u00e4\\:b\n"
                                           b"install.configuration=user\n")
    assert world.only_platform().argv[0] == "/mnt/ä:b/linux/x86/eclipse"


def test_the_other_values_are_written_as_they_are(world):
    assert block(world, r"com.vantor.rcp.core.locale=a\=b\:ä\\\u20ac!", "com.vantor.rcp.core.bidi=#x") == (
        BLOCK + "com.vantor.rcp.core.locale=a=b:ä\\€!\ncom.vantor.rcp.core.bidi=#x\n")


def test_in_the_c_locale_the_escaped_values_survive(world):
    """Only ASCII is text there; the escape makes it so."""
    world.install("user", "jvm.location=/mnt/\\u00e9/java")
    assert world.run(env={"LC_ALL": "C"}).status == 0
    assert read(USER_PROPERTIES) == BLOCK.replace("abc\n", "abc\nvm=/mnt/\\u00e9/java\n")


def test_an_empty_vm_is_not_written(world):
    assert block(world, "jvm.location=") == BLOCK


def test_empty_values_that_are_present_are_written(world):
    assert block(world, "com.vantor.rcp.core.locale=", "com.vantor.rcp.core.bidi=") == (
        BLOCK + "com.vantor.rcp.core.locale=\ncom.vantor.rcp.core.bidi=\n")


def test_of_equal_keys_the_first_is_written(world):
    assert block(world, "install.configuration=multiuser", "rcp.install.id=xyz") == BLOCK


@pytest.mark.parametrize("given, written", [
    ("100%%", "100%"), ("a%db", "ab"), ("%20n%s%n", ""), ("50% x", "50"), ("a%yb%", "a%yb%"), ("%%d", "%d"),
])
def test_the_block_is_its_own_format(world, given, written):
    """In every value; no memory is read or written for it."""
    assert block(world, "jvm.location=/" + given, "com.vantor.rcp.core.bidi=" + given) == (
        BLOCK.replace("abc\n", "abc\nvm=/%s\n" % written) + "com.vantor.rcp.core.bidi=%s\n" % written)


def test_the_user_has_what_the_next_start_reads(world):
    """The value of the block reaches the command, by the reader's rules."""
    world.install("user", r"jvm.location=C\:\\jre\\java")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + ["-vm", "C:/jre/java"] + STARTUP + system() + INSTALL_AREA


# ---- the lines that are copied

@pytest.mark.parametrize("given, written", [
    ("", ""),
    ("a=1\n", "a=1\n"),
    ("a=1", "a=1\n"),
    ("a=1\n\n\n\nb=2\n\n", "a=1\nb=2\n"),
    ("\n\n  \n\na=1\n", "a=1\n"),
    ("   a=1\n   b=2\n\tc=3\n", "a=1\nb=2\nc=3\n"),
    ("a=1  \nb=2\t\n", "a=1  \nb=2\t\n"),
    ("# a\n  # b\n! c\n#\n", "# a\n# b\n! c\n#\n"),
    ("a=1\r\nb=2\r\n", "a=1\r\nb=2\r\n"),
    ("ä=€\U0001f600\n", "ä=€\U0001f600\n"),
    (r"a=\u0041\n\\" + "\n", r"a=\u0041\n\\" + "\n"),
])
def test_lines_are_copied(world, given, written):
    """Empty lines vanish, and the indentation with them; nothing is unescaped."""
    assert copied(world, given) == written


@pytest.mark.parametrize("given, written", [
    ("osgi.os.linux=x", "osgi.os=x"),
    ("osgi.os.linux = x", "osgi.os = x"),
    ("osgi.os.linux:x.linux", "osgi.os:x.linux"),
    ("osgi.os.linux", "osgi.os"),
    ("osgi.os.linuxgtk=x", "osgi.os=x"),
    ("osgi.linux.os=x", "osgi.linux.os=x"),
    ("a.linux.linux=x", "a.linux=x"),
    (".linux=x", "=x"),
    ("linux=x", "linux=x"),
    ("a.Linux=x", "a.Linux=x"),
    ("a.lin=x", "a.lin=x"),
    ("a=b.win32", "a=b.win32"),
    ("a b.win32", "a b.win32"),
    ("-Da.win32=x", "-Da.win32=x"),
    ("-Da.linux=x", "-Da.linux=x"),
    ("#a.win32=x", "#a.win32=x"),
    ("!a.win32=x", "!a.win32=x"),
    ("win32.a=x", "win32.a=x"),
    ("a.solaris=x", "a.solaris=x"),
])
def test_lines_of_this_platform(world, given, written):
    """What follows the last point of the key decides, by its beginning; it goes, and so does the point."""
    assert copied(world, given + "\n") == written + "\n"


@pytest.mark.parametrize("given", [
    "a.win32=x", "a.macosx=x", "a.win32", "a.win32:x", "a.win32 x", "a.win32.x86".replace(".x86", "x86") + "=x",
    "a.macosxcarbon=x", "-Xa.win32=x", ".win32=x", "a.linux.win32=x", "a.win32\t=x",
])
def test_lines_of_other_platforms(world, given):
    assert copied(world, "a=1\n" + given + "\nb=2\n") == "a=1\nb=2\n"


@pytest.mark.parametrize("given, written", [
    ("a.win32=1,\\\n2,\\\n3\nb=2\n", "b=2\n"),
    ("a.win32=1,\\\\\nb=2\n", "b=2\n"),
    ("a.win32=1,\\\n# 2\nb=2\n", "b=2\n"),
    ("a.win32=1,\\\n# 2\\\nc\nb=2\n", "b=2\n"),
    ("a=1,\\\nb.win32=2,\\\nc.linux=3\nd.linux=4\n", "a=1,\\\nb.win32=2,\\\nc.linux=3\nd=4\n"),
    ("a.linux=1,\\\n2.win32\nb=2\n", "a=1,\\\n2.win32\nb=2\n"),
    ("# a\\\nb.win32=1\nc=2\n", "# a\\\nc=2\n"),
    ("a=1,\\\n# b\\\nc.win32\nd.win32=1\n", "a=1,\\\n# b\\\nc.win32\n"),
    ("\\\na.win32=1\n", "\\\n"),
    ("a.win32=1,\\\n", ""),
])
def test_continued_lines(world, given, written):
    """A dropped line takes its continuation with it, a kept one keeps it unfiltered, whatever it looks like. Comments
    are not continued, and a lone backslash continues nothing."""
    assert copied(world, given) == written


def test_a_last_line_that_is_continued_swallows_the_blocks_first(world):
    """The file holds both, but a reader takes the id for the end of that value."""
    world.install()
    world.base_properties("a=1,\\")
    world.fatal(world.run(), "QVMRL0005E: Couldn't find the rcp.install.id property!")
    assert read(USER_PROPERTIES) == "a=1,\\\n" + BLOCK


def test_the_first_line_loses_its_blanks_in_the_filter(world):
    """No line before it has swallowed them; a tab stays, and hides the key behind it."""
    assert copied(world, "   # a\n") == "# a\n"


def test_a_tab_in_front_of_the_first_line_stays(world):
    assert copied(world, "\ta.linux=1\n\tb.linux=2\n") == "\ta=1\nb=2\n"


@pytest.mark.parametrize("length, first", [(2023, 2023), (2024, 2024), (2025, 2024)])
def test_a_long_line_is_split_after_2024_characters(world, length, first):
    """Each part is a line of its own, and gets its own end."""
    text = "a=" + "x" * (length - 2)
    rest = text[first:] and text[first:] + "\n"
    assert copied(world, text + "\nb=2\n") == text[:first] + "\n" + rest + "b=2\n"


def test_the_second_part_of_a_long_line_is_filtered_as_a_line(world):
    assert copied(world, "a=" + "x" * 2022 + "b.win32=1\nc=3\n") == "a=" + "x" * 2022 + "\nc=3\n"


# ---- when it exists, and when values are missing

def test_an_existing_copy_is_never_rewritten(world):
    world.install("user", "jvm.location=/new/java")
    world.write(USER_PROPERTIES, "  rcp.install.id=abc\n\nrcp.base.location=/mnt/app/base\na.win32=1")
    world.base_properties("new=1")
    world.run()
    assert read(USER_PROPERTIES) == "  rcp.install.id=abc\n\nrcp.base.location=/mnt/app/base\na.win32=1"


def test_a_missing_configuration_word_ends_the_first_start(world):
    """The plain copy stays as the user's file, the filtered one without a block beside it. The next start believes the
    plain copy, and misses what the block would have added."""
    world.install(None)
    world.write(BASE + "/rcpinstall.properties", "\n  a.win32=1\n\nb.linux=2\n\n")
    world.fatal(world.run(), MISSING)
    assert read(USER_PROPERTIES) == "\n  a.win32=1\n\nb.linux=2\n\n"
    assert read(USER_PROPERTIES + ".new") == "b=2\n"
    world.fatal(world.run(), "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, "
                             "reinstall.")
    assert read(USER_PROPERTIES + ".new") == "b=2\n"


def test_without_a_required_value_a_copy_that_fails_leaves_nothing_either(world):
    """So the next start fails for the same reason, and not for what the first one left."""
    world.install(None)
    world.write(BASE + "/rcpinstall.properties", b"a=1\n\xa9")
    for _ in range(2):
        assert world.run().status == 255
        assert "\nQVMRL0193E: " in read(LOG)
        assert not os.path.lexists(USER_PROPERTIES)
        assert not os.path.lexists(USER_PROPERTIES + ".part")


def test_a_new_file_left_by_an_earlier_start_is_replaced(world):
    world.install()
    world.write(USER_PROPERTIES + ".new", "left=1\n" * 100)
    world.run()
    assert read(USER_PROPERTIES) == BLOCK
    assert not os.path.lexists(USER_PROPERTIES + ".new")


def test_when_the_new_file_cannot_be_opened_it_still_takes_the_place(world):
    """The user's file is deleted, and what stands at the new name is moved there: a link that leads nowhere."""
    world.install()
    world.link(USER_PROPERTIES + ".new", "/mnt/none/x")
    start = world.run()
    assert NOT_OPEN in world.log()
    world.fatal(start, "QVMRL0096E: Unable to load %s file!" % USER_PROPERTIES, "No such file or directory")
    assert os.readlink(USER_PROPERTIES) == "/mnt/none/x"
    assert not os.path.lexists(USER_PROPERTIES + ".new")


def test_when_only_the_copy_cannot_be_opened_the_users_file_is_empty(world):
    """The umask takes the user's own right to read away from what is made."""
    world.install()
    for name in ("logs", ".config/org.eclipse.update", "applications/eclipse/features", "applications/eclipse/plugins"):
        world.folder(WORKSPACE + "/" + name)
    world.write(WORKSPACE + "/.rcp.lock")
    world.base_properties("a=1")
    start = world.run(umask=0o444)
    assert start.status == 255
    assert tree(WORKSPACE + "/.config")[-1] == "0222 rcpinstall.properties"
    os.chmod(USER_PROPERTIES, 0o600)
    assert read(USER_PROPERTIES) == ""
    os.chmod(WORKSPACE + "/logs/velmora.log", 0o600)
    assert world.log().endswith(
        NOT_OPEN + "QVMRL0096E: Unable to load %s file! : Permission denied\n" % USER_PROPERTIES)


def test_a_folder_in_the_users_place_counts_as_present(world):
    """It reads as empty, so the command lacks the base location."""
    world.install()
    world.folder(USER_PROPERTIES)
    world.fatal(world.run(), "QVMRL0011E: Unable to determine RCP Base Plugin location. If the problem persists, "
                             "reinstall.")
