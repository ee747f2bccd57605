"""Command lines that are refused: dangerous words, double quotes, a link with a wrong number of words."""

import pytest

from world import HEAD, HOME, INSTALL_AREA, STARTUP, areas, system, tree

QUOTE = "QVMRL0089E: velmora invoked with double quote in arg - bad argument."
COUNT = "QVMRL0069E: velmora invoked with an invalid URL handler action - bad argument count."
JVM_PATH = 'QVMRL0190E: velmora invoked with arg containing "jvm.library.path" - not allowed.'
JAVA_PATH = 'QVMRL0191E: velmora invoked with arg containing "java.library.path" - not allowed.'
JAVA_HOME = 'QVMRL0192E: velmora invoked with arg containing "java.home" - not allowed.'


def accepted(world, *words, shown=None):
    assert world.run(*words).status == 0
    shown = words if shown is None else shown
    assert world.only_platform().argv == HEAD + list(shown) + areas() + STARTUP + system() + INSTALL_AREA


@pytest.mark.parametrize("words, message", [
    (["-Djvm.library.path=/x"], JVM_PATH),
    (["-Djava.library.path=/x"], JAVA_PATH),
    (["-Dx=java.home.bak"], JAVA_HOME),
    (["java.home"], JAVA_HOME),
    (["-vmargs", "-Djava.home=/x"], JAVA_HOME),
    (["vmarg.a=-Djava.library.path=/x"], JAVA_PATH),
    (["-foo", "", "xjava.homex"], JAVA_HOME),
    (["java.home,java.library.path,jvm.library.path"], JVM_PATH),
    (["java.home,java.library.path"], JAVA_PATH),
    (["-Da=java.home", "-Db=jvm.library.path"], JAVA_HOME),
])
def test_words_that_would_bend_the_jvm(world, words, message):
    """Found inside any word. Of several words the first one is told, of several names in a word the one of the JVM's
    library path, then that of Java, then the home."""
    world.install()
    world.fatal(world.run(*words), message)


@pytest.mark.parametrize("words", [["Java.Home"], ["java.homf"], ["java_home"], ["java", ".home"], ["library.path"]])
def test_words_that_only_look_like_them(world, words):
    world.install()
    accepted(world, *words)


@pytest.mark.parametrize("argv0, message", [
    ("/opt/java.home/velmora", JAVA_HOME), ('/opt/"x"/velmora', QUOTE)])
def test_the_name_of_the_launcher_is_looked_at_too(world, argv0, message):
    world.install()
    world.fatal(world.run(argv0=argv0), message)


@pytest.mark.parametrize("words", [['"'], ["-data", '/mnt/w"'], ["-vmargs", '-Da="x"'], ["-a", 'b"']])
def test_double_quotes(world, words):
    world.install()
    world.fatal(world.run(*words), QUOTE)


def test_other_quotes(world):
    world.install()
    accepted(world, "'", "`", "“", "&quot;")


@pytest.mark.parametrize("words", [
    ["-maxargcnt", "3", "a"],
    ["-maxargcnt", "5", "a"],
    ["-maxargcnt", "0"],
    ["-maxargcnt", "4"],
    ["-maxargcnt"],
    ["-maxargcnt", "x"],
    ["-maxargcnt", ""],
    ["a", "-maxargcnt", "3", "-maxargcnt", "6"],
    ["-maxargcnt", "3", "a", "-restart"],
    ["-maxargcnt", "5", "a", "-restart"],
])
def test_a_wrong_number_of_words(world, words):
    """The program path counts, "-restart" does not; without a number 0 is declared, and the first number counts."""
    world.install()
    world.fatal(world.run(*words), COUNT)


@pytest.mark.parametrize("words", [
    ["-maxargcnt", "3"],
    ["-maxargcnt", "4", "a"],
    ["a", "b", "-maxargcnt", "5"],
    ["-maxargcnt", "4abc", "a"],
    ["-maxargcnt", "0000000004", "a"],
    ["-maxargcnt", "5", "-maxargcnt", "0"],
])
def test_the_right_number_of_words(world, words):
    world.install()
    accepted(world, *words)


def test_the_right_number_of_words_on_a_restart(world):
    """The platform puts in one word more than the link had."""
    world.install()
    accepted(world, "-maxargcnt", "4", "a", "-restart", shown=["-maxargcnt", "4", "a"])


def test_the_number_is_checked_first_and_the_names_last(world):
    world.install()
    world.fatal(world.run("-maxargcnt", "1", '"java.home"'), COUNT)


def test_the_quotes_are_checked_before_the_names(world):
    world.install()
    world.fatal(world.run("java.home", '"'), QUOTE)


def test_only_the_workspace_has_been_made_by_then(world):
    """No lock, no log: the refusal comes before any file."""
    world.install()
    world.fatal(world.run('"'), QUOTE)
    assert tree(HOME) == ["0755 VANTOR/", "0755 VANTOR/RCP/", "0755 VANTOR/RCP/abc/", "0755 VANTOR/RCP/abc/anna/"]
