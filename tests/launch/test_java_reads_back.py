"""What a Java program makes of the properties files that velmora wrote: java.util.Properties loads them."""

import pathlib
import shutil
import subprocess

import pytest

from world import CONFIG, LAUNCHER, USER_PROPERTIES

SOURCE = pathlib.Path(__file__).resolve().parent / "java" / "ReadBack.java"


@pytest.fixture(scope="module")
def reader(tmp_path_factory):
    """The compiled program, as bytes: a world does not see where it lies."""
    if shutil.which("javac") is None or shutil.which("java") is None:
        pytest.skip("no JDK: javac and java are needed")
    folder = tmp_path_factory.mktemp("java")
    subprocess.run(["javac", "-d", str(folder), str(SOURCE)], check=True)
    return (folder / "ReadBack.class").read_bytes()


def read_back(world, reader, path):
    """Key and value of every entry, as Java gives them. Characters beyond sixteen bits do not occur."""
    world.write("/mnt/java/ReadBack.class", reader)
    printed = subprocess.run(
        [shutil.which("java"), "-Xshare:auto", "-XX:TieredStopAtLevel=1", "-XX:-UsePerfData", "-cp", "/mnt/java",
         "ReadBack", path], check=True, stdout=subprocess.PIPE, env={"PATH": "/usr/bin:/bin", "LC_ALL": "C"}).stdout
    text = lambda digits: "".join(chr(int(digits[at:at + 4], 16)) for at in range(0, len(digits), 4))
    return dict(map(text, line.split("\t")) for line in printed.decode().splitlines())


def test_recorded_words_come_back_whole(world, reader):
    """Up to the low sixteen bits of a character. A value begins after its blanks, so leading ones are lost."""
    ascii_but_the_double_quote = "".join(map(chr, range(0x21, 0x80))).replace('"', "")
    controls = "".join(map(chr, range(1, 0x20)))
    words = [
        (ascii_but_the_double_quote, ascii_but_the_double_quote),
        (controls, controls),
        ("a b  c ", "a b  c "),
        ("  both ends ", "both ends "),
        ("\t tab first", "\t tab first"),
        ("", ""),
        (" ", ""),
        ("key=value:#!", "key=value:#!"),
        ("back\\slash \\u0041 \\", "back\\slash \\u0041 \\"),
        ("größe \x80\xa0\xff", "größe \x80\xa0\xff"),
        ("€ Москва 東京 \uffff", "€ Москва 東京 \uffff"),
        ("\U0001f600", "\uf600"),
        ("\U00010041", "A"),
        ("50 %% %s %n", "50 %% %s %n"),
        ("#no comment", "#no comment"),
        ("two\nlines\r\n", "two\nlines\r\n"),
    ]
    world.install()
    assert world.run(*(given for given, _ in words), env={"LD_LIBRARY_PATH": "/a b:/c=d:/größe"}).status == 0
    expected = {"arg%d" % number: back for number, (_, back) in enumerate(words, 1)}
    expected.update({"arg0": LAUNCHER, "argc": "17",
                     "com.vantor.rcp.core.internal.librarypath": "/a b:/c=d:/größe"})
    assert read_back(world, reader, CONFIG + "/args.properties") == expected


def test_the_users_install_properties(world, reader):
    """The paths are escaped and come back whole; what is written verbatim comes back as Java reads those bytes: one
    character for each byte, and the backslash as the beginning of an escape."""
    world.install(
        "user",
        "jvm.location=C:\\\\jre\\\\bin=größe #1!/java",
        "com.vantor.rcp.core.locale=größe\\\\tde\\\\\\\\DE\\\\u0041 %%!",
        "com.vantor.rcp.core.bidi=  a=b : c ")
    world.base_properties(
        "# a comment",
        "greeting.linux=hello",
        "greeting.win32=none",
        "list=a,\\",
        "   b,\\",
        "   c",
        "grüße=größe",
        "escaped=gr\\u00f6\\u00dfe",
        "path=C:\\\\dir",
        "-Xmx 512m",
        "empty")
    assert world.run().status == 0
    assert read_back(world, reader, USER_PROPERTIES) == {
        # Copied lines, without the platform's suffix and without another platform's line. The continued ones lost
        # their indentation, which Java would not have seen.
        "greeting": "hello",
        "list": "a,b,c",
        "grÃ¼Ã\x9fe": "grÃ¶Ã\x9fe",
        "escaped": "größe",
        "path": "C:\\dir",
        "-Xmx": "512m",
        "empty": "",
        # The block.
        "rcp.install.id": "abc",
        "vm": "C:/jre/bin=größe #1!/java",
        "rcp.base.location": "${rcp.home}/base",
        "install.configuration": "user",
        "com.vantor.rcp.core.locale": "grÃ¶Ã\x9fe\tde\\DEA %!",
        "com.vantor.rcp.core.bidi": "a=b : c",
    }


def test_a_path_beyond_sixteen_bits_is_cut_to_them(world, reader):
    world.install("user", "jvm.location=/opt/\U0001f600/java")
    assert world.run().status == 0
    assert read_back(world, reader, USER_PROPERTIES)["vm"] == "/opt/\uf600/java"
