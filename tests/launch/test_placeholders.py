"""Placeholders in the values of properties: standard ones, other properties, the environment."""

import pytest

from world import INSTALL_AREA, WORKSPACE, lines, read, user_logs


def shown(world, *texts, words=(), env=None):
    """The system properties that come of these lines of the user's properties."""
    world.install()
    world.base_properties(*texts)
    assert world.run(*words, env=env).status == 0
    argv = world.only_platform().argv
    return argv[argv.index("-Drcp.install.config=user") + 1:argv.index(*INSTALL_AREA)]


def refused(world, text, *texts, words=(), env=None):
    world.install()
    world.base_properties(*texts)
    world.fatal(world.run(*words, env=env), "QVMRL0088E: property substitution is invalid (%s)" % text)


def test_standard_ones_are_replaced_everywhere(world):
    assert shown(world, "-Da=${rcp.home}:${workspace.location}:${rcp.data}:${rcp.home}") == [
        "-Da=/mnt/app:%s:%s:/mnt/app" % (WORKSPACE, WORKSPACE)]


def test_the_users_properties_then_the_recorded_words_then_those_of_the_jvm(world):
    """The first of equal keys counts: the user's before the record's, the record's before the JVM's. One word and the
    program make two."""
    world.jvm_properties("arg1=third", "argc=third")
    assert shown(world, "arg1=first", "-Da=${prop.arg1}", "-Dz=${prop.argc}", words=["-word"]) == [
        "-Da=first", "-Dz=2"]


def test_keys_are_not_touched(world):
    assert shown(world, "-D${rcp.home}=1") == ["-D${rcp.home}=1"]


@pytest.mark.parametrize("value, result", [
    ("x${prop.b}y", "x12y"),
    ("${prop.a}${prop.b}", "112"),
    ("${env.NOSUCH,dflt}", "dflt"),
    ("${env.NOSUCH,}", ""),
    ("${env.NOSUCH,a,b}", "a,b"),
    ("${env.SOME,dflt}", "thing"),
    ("${env.SOME}", "thing"),
    ("${env.EMPTY,dflt}", ""),
    ("${env.NESTED}", "1"),
    ("${env.NOSUCH,$}", "$"),
    ("${prop.empty}", ""),
    ("a$b{c}d", "a$b{c}d"),
    ("$", "$"),
])
def test_values(world, value, result):
    """What a value brings in is resolved again. A default is taken when the variable is unset, not when it is empty."""
    properties = ["a=1", "b=${prop.a}2", "empty="]
    env = {"SOME": "thing", "EMPTY": "", "NESTED": "${prop.a}"}
    assert shown(world, "-Dx=" + value, *properties, env=env) == ["-Dx=" + result]


def test_a_later_value_sees_the_earlier_ones_resolved(world):
    """So a chain that is written from its end has no limit."""
    chain = ["p30=end"] + ["p%d=${prop.p%d}" % (number, number + 1) for number in range(29, 0, -1)]
    assert shown(world, *chain, "-Dx=${prop.p1}") == ["-Dx=end"]


def test_a_standard_one_in_another_property(world):
    """Its own value has it resolved, so it must stand before the one that asks for it."""
    assert shown(world, "home=${rcp.home}/x", "-Dx=${prop.home}") == ["-Dx=/mnt/app/x"]


def test_a_standard_one_in_a_later_property(world):
    """It is brought in unresolved, where only the other kinds are looked for."""
    refused(world, "${rcp.home}/x", "-Dx=${prop.home}", "home=${rcp.home}/x")


@pytest.mark.parametrize("value, text", [
    ("${prop.nosuch}", "${prop.nosuch}"),
    ("x${env.NOSUCH}y", "x${env.NOSUCH}y"),
    ("${}", "${}"),
    ("${rcp.homes}", "${rcp.homes}"),
    ("${RCP.HOME}", "${RCP.HOME}"),
    ("${rcp.home}${nosuch}", "/mnt/app${nosuch}"),
    ("${prop.nosuch,dflt}", "${prop.nosuch,dflt}"),
    ("${env.nosuch", "${env.nosuc}"),
])
def test_what_cannot_be_resolved_ends_the_start(world, value, text):
    """It is put back as it was; one that is not closed runs to the end of the text, and loses its last character."""
    refused(world, text, "-Dx=" + value)


def test_resolving_goes_from_right_to_left(world):
    """The failure on the right comes first; from then on what a value brings in is not resolved."""
    refused(world, "${prop.b}${prop.nosuch}", "-Dx=${prop.a}${prop.nosuch}", "a=${prop.b}", "b=1")


def test_a_failure_on_the_left_comes_last(world):
    refused(world, "${prop.nosuch}1", "-Dx=${prop.nosuch}${prop.a}", "a=${prop.b}", "b=1")


def test_a_property_that_names_itself_is_given_up(world):
    refused(world, "${prop.c}", "c=${prop.c}")


@pytest.mark.parametrize("depth", [10, 11])
def test_a_chain_may_bring_in_nine_placeholders_in_a_row(world, depth):
    """The tenth at the same place ends it, although it has been replaced."""
    chain = ["p%d=${prop.p%d}" % (number, number + 1) for number in range(1, depth)] + ["p%d=end" % depth]
    if depth == 10:
        assert shown(world, "-Dx=${prop.p1}", *chain) == ["-Dx=end"]
    else:
        refused(world, "end", "-Dx=${prop.p1}", *chain)


def test_a_place_further_left_begins_the_count_anew(world):
    """Two chains of nine each."""
    chain = ["p%d=${prop.p%d}" % (number, number + 1) for number in range(1, 10)] + ["p10=end"]
    assert shown(world, "-Dx=${prop.p1}-${prop.p1}", *chain) == ["-Dx=end-end"]


def test_a_workspace_that_holds_its_own_placeholder(world):
    """It would be replaced for ever; found before the first replacement."""
    world.install()
    world.fatal(world.run("-data", "/mnt/${rcp.data}"), "QVMRL0088E: property substitution is invalid (/mnt/${rcp.data})")


def test_values_that_only_grow_are_replaced_to_the_end(world):
    """The installation lies in a directory whose name is the workspace's placeholder."""
    app = "/mnt/${workspace.location}"
    world.install()
    world.base_properties("-Dx=${rcp.home}")
    world.launcher(app + "/rcp/velmora")
    world.write(app + "/rcp/velmora.properties", "rcp.install.id=abc\nrcp.base.location=/mnt/app/base\n"
                "install.configuration=user\n")
    assert world.run("-data", "/mnt/w", program=app + "/rcp/velmora").status == 0
    argv = world.only_platform().argv
    assert "-Drcp.home=" + app in argv
    assert "-Dx=/mnt//mnt/w" in argv


def test_each_replacement_is_traced(world):
    """The whole text before and after it, from right to left. A variable that is not set is told with an empty line."""
    shown(world, "-Dx=${prop.a}-${env.NOSUCH,d}", "a=${env.USER}", words=["-debug"])
    log = read(user_logs()[0])
    begin = log.index("QVMRL0081I:  Environmental variable 'NOSUCH'")
    assert log[begin:].startswith(lines(
        "QVMRL0081I:  Environmental variable 'NOSUCH' is not set",
        "",
        "QVMRL0071I: Modified prop_contents ${prop.a}-${env.NOSUCH,d} => ${prop.a}-d",
        "QVMRL0071I: Modified prop_contents ${prop.a}-d => ${env.USER}-d",
        "QVMRL0071I: Modified prop_contents ${env.USER}-d => anna-d",
        "QVMRL0071I: Modified prop_contents ${env.USER} => anna"))
