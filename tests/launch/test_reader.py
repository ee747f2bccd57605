"""How properties files are read, as the platform gets to see it.

The file of the JVM is used, since it is read as it stands: each property "-D..." becomes one word.
"""

import pytest

from world import APP, HEAD, INSTALL_AREA, STARTUP, areas, lines, read, system, user_logs

JVM_FILE = APP + "/rcp/deploy/jvm.properties"


def shown(world, *texts, **how):
    """The words that come of a JVM file with these lines."""
    world.install()
    world.jvm_properties(*texts)
    return shown_again(world, **how)


def shown_again(world, **how):
    assert world.run(**how).status == 0
    argv = world.only_platform().argv
    return argv[argv.index("-Drcp.install.config=user") + 1:argv.index(*INSTALL_AREA)]


@pytest.mark.parametrize("text, word", [
    ("-Da=1", "-Da=1"),
    ("  -Da : 1  ", "-Da=1"),
    ("-Da value with  blanks", "-Da=value with  blanks"),
    ("-Da\t\t1\t", "-Da=1\t"),
    ("-Da", "-Da="),
    ("-Da=", "-Da="),
    ("-Da =:= 1", "-Da=1"),
    ("-Da==1", "-Da=1"),
    ("-Da=1=2:3 4", "-Da=1=2:3 4"),
    (r"-Da=\=x", "-Da=x"),
    (r"-Da=a\=x", "-Da=a=x"),
    (r"-Da\==x", "-Da=x"),
    (r"-Da=a\:b\#c\ d", "-Da=a:b#c d"),
    (r"-Da=C:\\dir\\sub", r"-Da=C:\dir\sub"),
    (r"-Da=C:\dir\new", "-Da=C:dirnew"),
    (r"-Da=\t\n\r\f", "-Da=tnrf"),
    (r"-Da=\\\\", r"-Da=\\"),
    (r"-Da=\u0041\u00e9\u20AC", "-Da=Aé€"),
    (r"-Da=\u41xy", "-Da=A"),
    (r"-Da=\u41", "-Da=A"),
    (r"-Da=1\u0020", "-Da=1"),
    (r"-Da=\u0020\u0020\u0020", "-Da=   "),
    (r"-Da=1\u0000234", "-Da=1"),
    (r"-Da=\u005cx", r"-Da=\x"),
    (r"-Da\u0042=1", r"-Da\u0042=1"),
    ("-Da=1#2", "-Da=1#2"),
    ("-Da=ä€\U0001f600", "-Da=ä€\U0001f600"),
    ("-Dä=1", "-Dä=1"),
])
def test_one_line(world, text, word):
    """Separators, escapes and blanks: keys know no escape, a value's leading separators are swallowed, even escaped
    ones; only blanks are trimmed, tabs stay, and so do blanks where there is nothing else."""
    assert shown(world, text) == [word]


@pytest.mark.parametrize("text", ["# -Da=1", "   # -Da=1", "#-Da=1\\", "!-Da=1", "", "   ", "\t"])
def test_lines_that_give_no_such_property(world, text):
    """Comments begin with "#" alone; "!" begins a key. A comment is not continued."""
    assert shown(world, text, "-Db=2") == ["-Db=2"]


def test_an_escaped_comment_is_a_key(world):
    """The backslash goes before the first character too, so the key begins with the sign."""
    assert shown(world, r"\#-Da=1", "-Db=2") == ["-Db=2"]


@pytest.mark.parametrize("texts, words", [
    (["-Da=a,\\", "    b"], ["-Da=a,b"]),
    (["-Da=a,\\", "", "  \t", "b", "-Db=2"], ["-Da=a,b", "-Db=2"]),
    (["-Da=a\\", "# no", "b"], ["-Da=ab"]),
    (["-Da=a\\\\", "-Db=2"], ["-Da=a\\", "-Db=2"]),
    (["-Da=a\\\\\\", "b"], ["-Da=a\\b"]),
    (["-D\\", "a=1"], ["-Da=1"]),
    (["-Da\\", "=1"], ["-Da=1"]),
    (["-Da=1\\", " = 2"], ["-Da=12"]),
    (["-Da=\\", "= 2"], ["-Da=2"]),
    (["-Da\\", "b", "c=d"], ["-Dabc=d"]),
    (["-Da=\\", "-Db=2"], ["-Da=-Db=2"]),
    (["-Da=1", "-Db=2\\"], ["-Da=1"]),
    (["-Da=1", "\\", "-Db=2"], ["-Da=1", "-Db=2"]),
])
def test_continued_lines(world, texts, words):
    """A property ends with the first line that adds to its value and has no backslash at its end; one that the end of
    the file cuts off is lost. Separators count anew at the beginning of each line."""
    assert shown(world, *texts) == words


def test_a_continued_x_line(world):
    """What began as such a line stays one, whatever the next line begins with."""
    world.install()
    world.jvm_properties("-Xa\\", ":b")
    world.run()
    assert world.only_platform().argv == HEAD + areas() + STARTUP + system() + INSTALL_AREA + ["-Xa:b"]


def test_a_line_of_one_character_leaves_the_mark_of_the_line_before(world):
    """A lone backslash begins a property that goes on; its separator is kept, as on the "-X" line before it."""
    world.install()
    world.jvm_properties("-Xa", "\\", "-Db=2", "\\", "-Dc=3")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + system() + ["-Db==2", "-Dc==3"] + INSTALL_AREA + ["-Xa"])


def test_the_last_line_needs_no_end(world):
    world.install()
    world.write(JVM_FILE, "-Da=1\n-Db=2")
    assert shown_again(world) == ["-Da=1", "-Db=2"]


def test_a_carriage_return_belongs_to_the_value(world):
    world.install()
    world.write(JVM_FILE, "-Da=1\r\n-Db=2\r\n")
    assert shown_again(world) == ["-Da=1\r", "-Db=2\r"]


def test_an_empty_file(world):
    world.install()
    world.write(JVM_FILE, "")
    assert shown_again(world) == []


def test_a_file_of_comments_alone(world):
    assert shown(world, "# a", "", "   # b") == []


def test_a_zero_byte_ends_the_line(world):
    world.install()
    world.write(JVM_FILE, b"-Da=1\0 2\n-Db=3\n")
    assert shown_again(world) == ["-Da=1", "-Db=3"]


def test_a_line_that_is_no_text_is_passed_over(world):
    world.install()
    world.write(JVM_FILE, b"-Da=1\n-Db=\xff\n-Dc=3\n")
    assert shown_again(world) == ["-Da=1", "-Dc=3"]


def test_in_the_c_locale_a_line_beyond_ascii_is_no_text(world):
    assert shown(world, "-Da=1", "-Db=ä", "-Dc=3", env={"LC_ALL": "C"}) == ["-Da=1", "-Dc=3"]


@pytest.mark.parametrize("length, kept", [(2023, 2019), (2024, 2020), (2025, 2020)])
def test_a_line_holds_2024_bytes(world, length, kept):
    """What is beyond is the next line: here a key of its own, which is no word."""
    assert shown(world, "-Da=" + "x" * (length - 4), "-Db=2") == ["-Da=" + "x" * kept, "-Db=2"]


def test_a_line_of_3000_bytes_gives_two_properties(world):
    assert shown(world, "-Da=" + "x" * 2020 + "-Db=" + "y" * 972) == ["-Da=" + "x" * 2020, "-Db=" + "y" * 972]


def test_a_long_line_is_cut_by_bytes_not_characters(world):
    """The character that stands across the cut spoils both halves: neither is text."""
    assert shown(world, "-Da=" + "x" * 2019 + "ä" + "-Db=2", "-Dc=3") == ["-Dc=3"]


def test_blanks_at_the_cut_belong_to_nobody(world):
    """The rest begins with its first character that is no white space."""
    assert shown(world, "-Da=" + "x" * 2020 + "   -Db=2") == ["-Da=" + "x" * 2020, "-Db=2"]


def test_the_first_of_equal_keys_is_found(world):
    world.install()
    world.base_properties("application=first", "application=second")
    world.jvm_properties("application=third")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + ["-application", "first"] + STARTUP + system() + INSTALL_AREA)


def test_an_empty_key_ends_a_search_by_prefix(world):
    """But not one by the whole key."""
    world.install()
    world.jvm_properties("-Da=1", "=v", "-Db=2", "-Xss1m", "cp=/c")
    world.run()
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + system() + ["-Da=1"] + INSTALL_AREA + ["-cp", "/c"])


def test_more_pairs_than_the_first_block_of_a_search(world):
    """The room for what is found grows at 10, 20 and 40 pointers."""
    world.install()
    for count in (5, 6, 10, 11, 20, 21, 50):
        words = ["-Dp%d=%d" % (number, number) for number in range(count)]
        world.jvm_properties(*words)
        world.run()
        world.all_ended()
        argv = world.platforms()[-1].argv
        assert argv == HEAD + areas() + STARTUP + system() + words + INSTALL_AREA


def test_reading_is_traced_line_by_line(world):
    """Comments too; blanks in front of a line, and the key as it was before anything was looked up."""
    world.install()
    world.jvm_properties("  # a comment", "  key : va\\", "  lue  ", "name", "-Xa:b", "java.home=/j")
    world.run("-debug")
    log = read(user_logs()[0])
    begin = log.index("QVMRL0077I: ")
    end = log.index("QVMRL0024I:   value  = \"/j\"\n")
    assert log[begin:end] == lines(
        'QVMRL0077I: loading jvm.properties at "/mnt/app/rcp/deploy/jvm.properties"',
        'QVMRL0032I: Prop Line = "# a comment"',
        'QVMRL0032I: Prop Line = "key : va\\"',
        'QVMRL0032I: Prop Line = "lue  "',
        'QVMRL0023I:   attrib = "key"',
        'QVMRL0024I:   value  = "value"',
        'QVMRL0032I: Prop Line = "name"',
        'QVMRL0023I:   attrib = "name"',
        'QVMRL0024I:   value  = ""',
        'QVMRL0032I: Prop Line = "-Xa:b"',
        'QVMRL0023I:   attrib = "-Xa"',
        'QVMRL0024I:   value  = ":b"',
        'QVMRL0032I: Prop Line = "java.home=/j"',
        'QVMRL0023I:   attrib = "java.home"',
    )


def test_a_long_line_is_traced_whole(world):
    """The limit of 999 characters is one for formats."""
    world.install()
    world.jvm_properties("-Da=" + "x" * 2000)
    world.run("-debug")
    assert 'QVMRL0032I: Prop Line = "-Da=%s"\n' % ("x" * 2000) in read(user_logs()[0])


def test_a_computed_property_is_traced_too(world):
    world.install()
    world.jvm_properties("# nothing")
    world.run("-debug")
    assert lines('QVMRL0032I: Prop Line = "# nothing"', 'QVMRL0126I:   key = "java.home"',
                 'QVMRL0127I:   value  = "/mnt/app"') in read(user_logs()[0])


def test_the_launchers_own_properties_must_be_there(world):
    world.launcher(APP + "/rcp/velmora")
    world.fatal(world.run(), "QVMRL0096E: Unable to load /mnt/app/rcp/velmora.properties file!",
                "No such file or directory")


def test_the_launchers_own_properties_must_be_readable(world):
    world.install()
    world.write(APP + "/rcp/velmora.properties", "", 0o000)
    world.fatal(world.run(), "QVMRL0096E: Unable to load /mnt/app/rcp/velmora.properties file!", "Permission denied")
