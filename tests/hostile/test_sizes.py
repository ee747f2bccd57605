"""More of everything than anybody would write: nothing crashes, nothing hangs, nothing is lost without being said."""

import pytest

from world import (APP, BASE, CONFIG, HEAD, INSTALL_AREA, PROPERTIES, STARTUP, USER_PROPERTIES, WORKSPACE, areas,
                   lines, read, system)

LONGEST_WORD = 128 * 1024 - 1  # bytes that the kernel takes in one word, its end not counted
LINE = 4095                    # bytes of a line of the log


def test_a_mebibyte_of_words(world):
    """As many of the longest words as make 1 MiB: the platform gets each of them whole, the log shows what fits."""
    world.install()
    words = [letter * LONGEST_WORD for letter in "abcdefgh"]
    assert world.run(*words).status == 0
    assert world.only_platform().argv == HEAD + words + areas() + STARTUP + system() + INSTALL_AREA
    log = world.log().splitlines()
    for word in words:
        assert word[:LINE] in log
    assert all(len(line) <= LINE for line in log)


def test_ten_thousand_words(world):
    """All are handed on, and all are recorded."""
    world.install()
    words = ["w%d" % number for number in range(10000)]
    assert world.run(*words).status == 0
    assert world.only_platform().argv == HEAD + words + areas() + STARTUP + system() + INSTALL_AREA
    assert read(CONFIG + "/args.properties") == lines(
        "arg0=" + APP + "/rcp/velmora", *("arg%d=w%d" % (number + 1, number) for number in range(10000)),
        "argc=10001", "com.vantor.rcp.core.internal.librarypath=")


def test_words_that_are_no_text(world):
    """Bytes that the locale cannot decode make an empty word; control characters are handed on and escaped."""
    world.install()
    assert world.run(b"-a\xff\xfe", "-b\x01\x7f", "-c%n%s%1000000d").status == 0
    assert world.only_platform().argv == (
        HEAD + ["", "-b\x01\x7f", "-c%n%s%1000000d"] + areas() + STARTUP + system() + INSTALL_AREA)
    assert read(CONFIG + "/args.properties").splitlines()[1:4] == ["arg1=", r"arg2=-b\u0001\u007f",
                                                                    "arg3=-c%n%s%1000000d"]


@pytest.mark.parametrize("path", [PROPERTIES, BASE + "/rcpinstall.properties", BASE + "/config.ini",
                                  BASE + "/platform.xml", APP + "/rcp/deploy/jvm.properties"])
def test_a_line_of_a_mebibyte(world, path):
    """Properties are read in pieces of 2024 bytes, each a line of its own; the two plain copies keep the bytes."""
    world.install()
    world.jvm_properties("vmarg.a=-Da=1")
    known = read(path)
    world.write(path, known + "x" * (1 << 20) + "\n")
    assert world.run().status == 0
    world.only_platform()
    if path.endswith("config.ini"):
        assert read(CONFIG + "/config.ini") == known + "x" * (1 << 20) + "\n"
    if path.endswith("platform.xml"):
        text = read(CONFIG + "/org.eclipse.update/platform.xml")
        assert text.startswith(known + "x" * 2024 + "\n" + "x" * 2024 + "\n")
        assert text.replace("\n", "").count("x") == 1 << 20
    if path.endswith("rcpinstall.properties"):
        assert read(USER_PROPERTIES).startswith("x" * 2024 + "\n" + "x" * 2024 + "\n")


def test_a_mark_of_a_mebibyte(world):
    """The shared extension's mark is copied as it is."""
    world.install()
    text = "name=" + "x" * (1 << 20) + "\n"
    world.write(APP + "/shared/eclipse/.eclipseextension", text)
    assert world.run().status == 0
    world.only_platform()
    assert read(WORKSPACE + "/applications/eclipse/.eclipseextension") == text


def test_a_history_of_a_mebibyte_in_one_line(world):
    """It counts as 518 lines of 2024 bytes and one of 144; 101 lines are kept, the new one included."""
    world.install()
    history = WORKSPACE + "/logs/shutdown.log"
    world.write(history, "x" * (1 << 20) + "\n")
    assert world.run().status == 0
    world.only_platform()
    kept = read(history).splitlines()
    assert kept[:-1] == ["x" * 2024] * 99 + ["x" * 144]
    assert kept[-1].startswith("Started ")


def test_a_value_of_a_mebibyte(world):
    """Continued over many lines, it reaches the platform as one word of the longest length that a word can have."""
    world.install()
    pieces = ["y" * 2000] * 64
    world.base_properties("-Dlong=" + "\\\n".join(pieces))
    assert world.run().status == 0
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + system() + ["-Dlong=" + "y" * 128000] + INSTALL_AREA)


def test_a_word_that_the_kernel_refuses(world):
    """A word that is longer than the kernel takes: the platform cannot be executed, and the log says so."""
    world.install()
    world.base_properties("-Dlong=" + "\\\n".join(["y" * 2000] * 524))
    assert world.run().status == 0
    assert world.platforms() == []
    assert "Unable to execute /mnt/app/base/linux/x86/eclipse : Argument list too long\n" in world.log()


def test_a_hundred_thousand_properties(world):
    world.install("user", *("key%d=value" % number for number in range(100000)), "product=last")
    assert world.run().status == 0
    assert world.only_platform().argv == (
        HEAD + areas() + ["-product", "last"] + STARTUP + system() + INSTALL_AREA)


@pytest.mark.within(300)
def test_a_million_placeholders(world):
    """Ten in each of a hundred thousand values."""
    world.install()
    world.base_properties("a=1", "b=${prop.a}2", *("k%d=" % number + "${prop.a}" * 10 for number in range(100000)),
                          "-Dlast=${prop.k99999}")
    assert world.run(within=120).status == 0
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + system() + ["-Dlast=1111111111"] + INSTALL_AREA)


def test_a_hundred_thousand_placeholders_in_one_value(world):
    world.install()
    world.base_properties("a=1", "-Dmany=" + "\\\n".join(["${prop.a}" * 200] * 500))
    assert world.run(within=120).status == 0
    assert world.only_platform().argv == (
        HEAD + areas() + STARTUP + system() + ["-Dmany=" + "1" * 100000] + INSTALL_AREA)


@pytest.mark.parametrize("texts", [
    ["a=${prop.a}"],
    ["a=${prop.b}", "b=${prop.a}"],
    ["a=${prop.b}${prop.b}", "b=${prop.a}${prop.a}"],
    ["a=x${prop.a}y"],
    ["a=${prop.${prop.a}}"],
    ["a=${prop.a", "b=${prop.b}"],
])
def test_placeholders_that_never_end(world, texts):
    world.install()
    world.base_properties(*texts)
    start = world.run()
    assert start.status == 255
    assert world.platforms() == []
    assert world.log().splitlines()[-1].startswith("QVMRL0088E: property substitution is invalid (")


NO_TEXT = b"zero=1\0hidden\n\xff\xfe\x80=bad\nlong" + b"\xc3" * 5000 + b"\n"


@pytest.mark.parametrize("path, before, after, words", [
    (PROPERTIES, [], b"product=after\n", ["-product", "after"]),
    (APP + "/rcp/deploy/jvm.properties", [], b"personality=after\n", ["-personality", "after"]),
])
def test_properties_that_are_no_text(world, path, before, after, words):
    """A zero byte ends its line, and a line that the locale cannot decode counts as empty; what follows is read."""
    world.install()
    world.jvm_properties("x=1")
    with open(path, "ab") as file:
        file.write(NO_TEXT + after)
    assert world.run().status == 0
    assert world.only_platform().argv == HEAD + areas() + words + STARTUP + system() + INSTALL_AREA


def test_a_template_that_is_no_text(world):
    """The lines that the locale cannot decode come out empty: the long one is two of them and a rest."""
    world.install()
    world.write(BASE + "/platform.xml", b"<a>\n" + NO_TEXT + b"<b>\n")
    assert world.run().status == 0
    assert read(CONFIG + "/org.eclipse.update/platform.xml") == "<a>\nzero=1\n\n\n\n\n<b>\n"


@pytest.mark.parametrize("name", ["config.ini", "rcpinstall.properties"])
def test_plain_copies_of_what_is_no_text(world, name):
    """They are copied through the locale, which ends here."""
    world.install()
    world.write(BASE + "/" + name, b"a=1\n\xff\xfe\n")
    world.fatal(world.run(), "QVMRL0193E: Did not encounter EOF while copying file contents",
                "Invalid or incomplete multibyte or wide character")
