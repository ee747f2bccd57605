"""What velmora.properties(5) says of the dialect by example: the page shows it so, and the launcher reads it so."""

import pathlib
import re

from conftest import APP, ROOT, needs
from test_catalogue import LOGS
from test_pages import said

# (the line in a file, its key, its value, what the page shows of it)
EXAMPLES = [
    ("key=value", "key", "value", "key=value"),
    ("key : value", "key", "value", "key : value"),
    ("key value", "key", "value", "key value"),
    ("key == value", "key", "value", "key == value"),
    ("key", "key", "", "a line without a separator is a key with an empty value"),
    ("!key=v", "!key", "v", '"!key=v" is the key !key'),
    ("list=a,\\\n    b", "list", "a,b", "list=a,\\ b is a,b."),
    ("list=a\\ \nx=y", "list", "a", "A backslash in front of a blank at the end of the line continues nothing"),
    (None, "x", "y", "continues nothing"),
    ("list=a,\\\n# a comment\nb", "list", "a,b", "A comment line in between is passed over"),
    ("a\\\nb\nc=d", "abc", "d", '"a\\", "b", "c=d" is one property, with the key abc'),
    ("x=a\\\\b", "x", "a\\b", "\\\\ is a backslash"),
    ("x=\\u41", "x", "A", "\\u41 and \\u0041 are both A"),
    ("x=\\u0041", "x", "A", "\\u41 and \\u0041 are both A"),
    ("x=\\u41xy", "x", "A", "\\u41xy is A too"),
    ("x=a\\u0000b", "x", "a", "\\u0000 cuts the value there"),
    ("x=a\\tb", "x", "atb", "\\t is t"),
    ("x=a\\nb", "x", "anb", "\\n is n"),
    ("a\\b=c", "a\\b", "c", "A backslash in a key stays"),
    ("a\\:b", "a", "b", "all of them but # are separators all the same"),
    ("a\\#b=c", "a#b", "c", "all of them but # are separators all the same"),
    ("key=\\=x", "key", "x", '"key=\\=x" has the value x'),
    ("key=a\\=x", "key", "a=x", '"key=a\\=x" has the value a=x'),
    ("x=\\u0020a\\u0020", "x", "a", "also those that come from \\u0020"),
    ("x=true\t", "x", "true\t", "Tabs at the end stay"),
    ("x=true\r", "x", "true\r", "So does the carriage return"),
    ("x=\\u0020\\u0020", "x", "  ", "A value of blanks alone stays as it is"),
    ("-Xshareclasses:name=rcp", "-Xshareclasses", ":name=rcp",
     '"-Xshareclasses:name=rcp" is the key -Xshareclasses and the value :name=rcp'),
    ("   # indented", None, None, "A line that begins with #, perhaps behind blanks"),
    ("=v", "", "v", 'A line with an empty key ("=v")'),
    ("lost=a\\", None, None, "A property that is continued at the end of the file is lost"),
]


def test_the_page_shows_the_examples():
    needs("man", "man-db")
    page = said(["man", "-l", "-E", "UTF-8", str(ROOT / "packaging" / "man" / "velmora.properties.5")], MANWIDTH="400").stdout
    page = re.sub(r"\s+", " ", page)
    for _, _, _, shown in EXAMPLES:
        assert shown in page


def test_the_launcher_reads_the_examples_so(installation):
    text = "".join(line + "\n" for line, _, _, _ in EXAMPLES if line is not None)

    def story(world):
        folder = pathlib.Path(APP, "rcp", "deploy")
        folder.mkdir()
        (folder / "jvm.properties").write_bytes(text.encode())
        assert world.run(["velmora", "-velmoraWait", "-debug"]) == (0, "", "")
        log, = LOGS.glob("velmora_*.log")
        return log.read_bytes().decode()
    log = installation.isolated(story)
    read = re.findall(r'^QVMRL0023I:   attrib = "(.*)"\nQVMRL0024I:   value  = "(.*)"\n', log.partition("QVMRL0077I: ")[2], re.M)
    assert read == [(key, value) for _, key, value, _ in EXAMPLES if key is not None]
