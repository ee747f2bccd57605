"""The user's platform.xml: made once from the installation's template, with the JVM's feature filled in."""

import os

import pytest

from contents import contents
from world import APP, BASE, CONFIG, JAVA, LOG, lines, read, read_bytes, tree

UPDATE = CONFIG + "/org.eclipse.update"
TARGET = UPDATE + "/platform.xml"
TEMPLATE = BASE + "/platform.xml"
PLUGIN = APP + "/eclipse/plugins/jre.x"
FEATURES = ["jvm.feature.id=org.jvm", "jvm.feature.version=1.8", "jvm.parent.feature.id=org.parent",
            "jvm.parent.feature.version=2.0"]


def install(world, template, *properties, configuration="user", plugin=True):
    """An installation with this template; its JVM lies in a plug-in of the platform, or elsewhere."""
    where = PLUGIN + "/jre/bin/java" if plugin else JAVA
    world.install(configuration, "jvm.location=" + where, *properties)
    world.write(TEMPLATE, template)
    if plugin:
        world.jvm_properties(root=PLUGIN + "/")


def made(world, template, *properties, **how):
    """What the user's file is made of."""
    install(world, template, *properties, **how)
    start = world.run()
    assert start.status == 0
    world.only_platform()
    assert tree(UPDATE) == ["0644 platform.xml"]
    return read(TARGET)


def errors(path=LOG):
    """The error lines of the log that have to do with platform.xml."""
    return [line for line in read(path).splitlines() if line[:10] in (
        "QVMRL0101E", "QVMRL0102E", "QVMRL0103E", "QVMRL0104E", "QVMRL0139E")]


def missing(number):
    return ["QVMRL%sE: Error while copying platform.xml to user specific platform.xml file." % number]


# ---- what is filled in

def test_a_template_without_placeholders_is_copied(world):
    text = "<config>\n<site url=\"a\"/>\n</config>\n"
    assert made(world, text) == text


def test_the_features_are_filled_in(world):
    """Every placeholder of a line: with id and version twice each, all four are substituted."""
    assert made(
        world,
        "<config>\n"
        '<feature id="${jvm.feature.id}" version="${jvm.feature.version}" '
        'url="${jvm.feature.id}_${jvm.feature.version}/"/>\n'
        '<feature id="${jvm.parent.feature.id}" version="${jvm.parent.feature.version}" '
        'url="${jvm.parent.feature.id}_${jvm.parent.feature.version}/"/>\n'
        "</config>\n", *FEATURES) == (
        "<config>\n"
        '<feature id="org.jvm" version="1.8" url="org.jvm_1.8/"/>\n'
        '<feature id="org.parent" version="2.0" url="org.parent_2.0/"/>\n'
        "</config>\n")


def test_one_line_may_name_both_features(world):
    assert made(world, "${jvm.feature.id} ${jvm.parent.feature.id} ${jvm.feature.version} "
                       "${jvm.parent.feature.version}\n", *FEATURES) == "org.jvm org.parent 1.8 2.0\n"


def test_a_version_goes_only_on_a_line_with_its_id(world):
    """Alone it is copied as it stands; the other feature's id does not count."""
    template = lines("${jvm.feature.version}", "${jvm.parent.feature.version}",
                     "${jvm.feature.version} ${jvm.parent.feature.id} ${jvm.feature.id2}",
                     "${jvm.feature.id} ${jvm.parent.feature.version}")
    assert made(world, template, *FEATURES) == lines(
        "${jvm.feature.version}", "${jvm.parent.feature.version}",
        "${jvm.feature.version} org.parent ${jvm.feature.id2}",
        "org.jvm ${jvm.parent.feature.version}")


def test_the_placeholders_are_exact(world):
    template = lines("${JVM.feature.id}", "${jvm.feature.id", "$jvm.feature.id}", "${ jvm.feature.id}", "${rcp.home}",
                     "$${jvm.feature.id}}")
    assert made(world, template, *FEATURES) == lines(
        "${JVM.feature.id}", "${jvm.feature.id", "$jvm.feature.id}", "${ jvm.feature.id}", "${rcp.home}",
        "$org.jvm}")


def test_an_id_may_bring_in_the_version_and_the_parent(world):
    """The line is looked at again as it stands after each replacement."""
    properties = ["jvm.feature.id=a-${jvm.feature.version}-${jvm.parent.feature.id}", "jvm.feature.version=1",
                  "jvm.parent.feature.id=p", "jvm.parent.feature.version=2"]
    assert made(world, "${jvm.feature.id}\n", *properties) == "a-1-p\n"


def test_what_a_later_value_brings_in_stays(world):
    """Each kind is replaced once: the id, then its version, then the parent's."""
    properties = ["jvm.feature.id=a", "jvm.feature.version=<${jvm.feature.id}>",
                  "jvm.parent.feature.id=${jvm.feature.id}", "jvm.parent.feature.version=${jvm.parent.feature.id}"]
    assert made(world, "${jvm.feature.id} ${jvm.feature.version}\n"
                       "${jvm.parent.feature.id} ${jvm.parent.feature.version}\n", *properties) == (
        "a <${jvm.feature.id}>\n${jvm.feature.id} ${jvm.parent.feature.id}\n")


@pytest.mark.parametrize("managed", [True, False])
def test_what_makes_no_file_makes_no_first_start(world, managed):
    """The second start would provision otherwise, and so would every one after it."""
    level = "provisioning.manifest.version=2"
    install(world, "", "provisioning=true", "provisioning.application=org.prov", level,
            *([] if managed else ["update.policy.managed=false"]))
    world.base_properties(level)
    os.unlink(TEMPLATE)
    assert [world.run("-velmoraWait").status for _ in range(2)] == [0, 0]
    assert ["org.prov" in platform.argv for platform in world.platforms()] == [True, False]
    assert tree(UPDATE) == []


def test_empty_values_are_values(world):
    assert made(world, "<${jvm.feature.id},${jvm.feature.version}>\n", "jvm.feature.id=", "jvm.feature.version=") == (
        "<,>\n")


def test_the_values_are_those_of_the_installation(world):
    """The user's properties and the JVM's own do not count."""
    install(world, "${jvm.feature.id} ${jvm.feature.version}\n", "jvm.feature.id=mine", "jvm.feature.version=1")
    world.base_properties("jvm.feature.id=base")
    world.jvm_properties("jvm.feature.id=jvm", root=PLUGIN + "/")
    world.run()
    assert read(TARGET) == "mine 1\n"


@pytest.mark.parametrize("line", [
    '  <feature id="${jvm.feature.id}" version="${jvm.feature.version}"/> text',
    "${jvm.parent.feature.id}",
    "${jvm.feature.id}${jvm.parent.feature.id}",
])
@pytest.mark.parametrize("properties", [[], FEATURES])
def test_without_a_plugin_jvm_a_feature_line_is_replaced_as_a_whole(world, line, properties):
    """Nothing else of the line survives; no value is asked for."""
    assert made(world, lines("<config>", line, "</config>"), *properties, plugin=False) == lines(
        "<config>", "<feature>", "</config>")


def test_without_a_plugin_jvm_a_version_alone_is_copied(world):
    assert made(world, "${jvm.feature.version}\n", plugin=False) == "${jvm.feature.version}\n"


# ---- what stops the copy

@pytest.mark.parametrize("line, known, number", [
    ("${jvm.feature.id} ${jvm.feature.version}", ["jvm.feature.version=1"], "0101"),
    ("${jvm.feature.id} ${jvm.feature.version}", ["jvm.feature.id=a"], "0101"),
    ("${jvm.feature.id}", ["jvm.feature.id=a"], "0101"),
    ("${jvm.parent.feature.id}", ["jvm.parent.feature.version=1"], "0102"),
    ("${jvm.parent.feature.id}", ["jvm.parent.feature.id=a"], "0102"),
    ("${jvm.feature.id}${jvm.parent.feature.id}", ["jvm.feature.id=a", "jvm.feature.version=1"], "0102"),
    ("${jvm.feature.id}${jvm.parent.feature.id}", [], "0101"),
])
def test_a_missing_value_stops_the_copy(world, line, known, number):
    """A third line that needs a value that is not there yields a file of exactly the first two lines."""
    assert made(world, lines("<one>", "<two>", line, "<four>"), *known) == "<one>\n<two>\n"
    assert errors() == missing(number)


def test_a_copy_that_was_stopped_is_believed_by_later_starts(world):
    install(world, lines("<one>", "${jvm.feature.id}", "<three>"))
    world.run()
    world.write(APP + "/rcp/velmora.properties", read(APP + "/rcp/velmora.properties") + lines(*FEATURES))
    world.run()
    assert read(TARGET) == "<one>\n"


def test_a_missing_value_in_the_first_line_leaves_an_empty_file(world):
    assert made(world, lines("${jvm.feature.id}", "<two>")) == ""


@pytest.mark.parametrize("line, properties, number", [
    ("${jvm.feature.id}", ["jvm.feature.id=x${jvm.feature.id}", "jvm.feature.version=1"], "0101"),
    ("${jvm.feature.id}${jvm.feature.version}", ["jvm.feature.id=a", "jvm.feature.version=${jvm.feature.version}"],
     "0101"),
    ("${jvm.parent.feature.id}", ["jvm.parent.feature.id=${jvm.parent.feature.id}", "jvm.parent.feature.version=1"],
     "0102"),
])
def test_a_value_that_holds_its_own_placeholder_counts_as_missing(world, line, properties, number):
    """It would be put in for ever."""
    assert made(world, lines("<one>", line, "<three>"), *properties) == "<one>\n"
    assert errors() == missing(number)


# ---- lines

@pytest.mark.parametrize("length, result", [
    (2023, ["x" * 2023]),
    (2024, ["x" * 2024]),
    (2025, ["x" * 2024, "x"]),
    (4049, ["x" * 2024, "x" * 2024, "x"]),
])
def test_a_long_line_is_split(world, length, result):
    """After 2024 characters."""
    assert made(world, lines("<a>", "x" * length, "<b>")) == lines("<a>", *result, "<b>")


def test_a_placeholder_on_the_split_is_none(world):
    line = "x" * 2020 + "${jvm.feature.id}"
    assert made(world, lines(line), *FEATURES) == lines("x" * 2020 + "${jv", "m.feature.id}")


def test_blank_lines_and_indentation_are_lost(world):
    """The end of each line swallows all white space behind it; only the first line's own indentation stays."""
    assert made(world, "  <a>\n\n\n    <b>\n\t<c> \n \n<d>") == "  <a>\n<b>\n<c> \n<d>\n"


@pytest.mark.parametrize("head", ["\n", "\n\n \n\t\n"])
def test_blank_lines_at_the_head_are_swallowed(world, head):
    """Like every other blank line, with the indentation that follows."""
    assert made(world, head + "  <a>\n<b>\n") == "<a>\n<b>\n"


def test_an_empty_template_gives_an_empty_file(world):
    assert made(world, "") == ""


def test_the_locales_text_and_foreign_line_ends_are_copied(world):
    """A carriage return is a character like any other."""
    assert made(world, "größe €\r\n<b>\r\n") == "größe €\r\n<b>\r\n"


def test_the_template_of_the_configuration_goes_first(world):
    install(world, "<base>\n")
    world.write(BASE + "/config/user/platform.xml", "<user>\n")
    world.run()
    assert read(TARGET) == "<user>\n"


# ---- when none is made

def test_an_existing_file_is_left_alone(world):
    """Whatever the properties say, and even when it is empty."""
    install(world, "<new>\n", *FEATURES)
    world.write(TARGET, "")
    before = os.stat(TARGET)
    assert world.run().status == 0
    after = os.stat(TARGET)
    assert (after.st_ino, after.st_mtime_ns, after.st_size) == (before.st_ino, before.st_mtime_ns, 0)


def test_a_folder_in_its_place_is_left_alone(world):
    """It exists."""
    install(world, "<new>\n")
    world.write(TARGET + "/mine", "x")
    assert world.run().status == 0
    assert contents(UPDATE) == {"platform.xml/": None, "platform.xml/mine": "x"}
    assert errors() == []


def test_the_configuration_userpb_has_none(world):
    """Not even the folder."""
    install(world, "<new>\n", configuration="userpb")
    assert world.run().status == 0
    assert not os.path.lexists(UPDATE)


def test_an_update_policy_that_is_not_managed(world):
    """The value "false" makes the folder and no file."""
    install(world, "<new>\n", "update.policy.managed=false")
    assert world.run().status == 0
    assert contents(UPDATE) == {}
    assert errors() == []


@pytest.mark.parametrize("value", ["FALSE", "False", "true", "", "false1", "no"])
def test_any_other_update_policy(world, value):
    """Also in capitals, the file is made."""
    assert made(world, "<new>\n", "update.policy.managed=" + value) == "<new>\n"


# ---- bad input

def test_a_missing_template(world):
    """Told in the log; the start goes on without a file, and a later one with the template makes it."""
    install(world, "")
    os.unlink(TEMPLATE)
    assert world.run("-velmoraWait").status == 0
    assert errors() == ['QVMRL0104E: Unable to open platform.xml."%s"' % TEMPLATE]
    assert contents(UPDATE) == {}
    world.write(TEMPLATE, "<late>\n")
    assert world.run().status == 0
    assert contents(UPDATE) == {"platform.xml": "<late>\n"}
    assert len(world.platforms()) == 2


def test_a_template_that_cannot_be_read(world):
    install(world, "<new>\n")
    os.chmod(TEMPLATE, 0)
    assert world.run().status == 0
    assert errors() == ['QVMRL0104E: Unable to open platform.xml."%s"' % TEMPLATE]
    assert contents(UPDATE) == {}
    world.only_platform()


def test_a_template_that_is_a_folder(world):
    """It opens, and has no lines."""
    install(world, "")
    os.unlink(TEMPLATE)
    world.folder(TEMPLATE)
    assert world.run().status == 0
    assert contents(UPDATE) == {"platform.xml": ""}


def test_a_folder_that_may_not_be_written_to(world):
    """Told in the log; the start goes on."""
    install(world, "<new>\n")
    world.folder(UPDATE, 0o555)
    assert world.run().status == 0
    assert errors() == ['QVMRL0139E: Unable to open platform.xml for writing."%s"' % TARGET]
    assert contents(UPDATE) == {}
    world.only_platform()


def test_a_file_of_the_users_that_he_may_neither_read_nor_write(world):
    """It counts as absent, cannot be opened, and stays as it is."""
    install(world, "<new>\n")
    world.write(TARGET, "<mine>\n", 0o000)
    assert world.run().status == 0
    assert errors() == ['QVMRL0139E: Unable to open platform.xml for writing."%s"' % TARGET]
    assert contents(UPDATE) == {"platform.xml": "<mine>\n"}


def test_a_file_in_the_place_of_the_folder(world):
    """Nothing can be made there: the start ends, the file stays."""
    install(world, "<new>\n")
    world.write(UPDATE, "mine")
    world.fatal(world.run(), "QVMRL0039E: Unable to create %s directory." % UPDATE, "File exists")
    assert read(UPDATE) == "mine"


def test_a_link_in_the_place_of_the_folder(world):
    """A link to a folder is no folder here."""
    install(world, "<new>\n")
    world.folder("/mnt/elsewhere")
    world.link(UPDATE, "/mnt/elsewhere")
    world.fatal(world.run(), "QVMRL0039E: Unable to create %s directory." % UPDATE, "File exists")
    assert contents("/mnt/elsewhere") == {}


def test_a_dangling_link_in_the_place_of_the_file(world):
    """It counts as absent, and is written through."""
    install(world, "<new>\n")
    world.link(TARGET, "/mnt/elsewhere.xml")
    assert world.run().status == 0
    assert contents(UPDATE) == {"platform.xml": "-> /mnt/elsewhere.xml"}
    assert read("/mnt/elsewhere.xml") == "<new>\n"


def test_a_link_that_leads_to_itself(world):
    install(world, "<new>\n")
    world.link(TARGET, "platform.xml")
    assert world.run().status == 0
    assert errors() == ['QVMRL0139E: Unable to open platform.xml for writing."%s"' % TARGET]


def test_a_full_disk(world):
    """The one failed write is told once. What had been written stays, a beginning of the file that may end within a
    line, and the start goes on."""
    whole = "".join("<line number='%04d'/>\n" % number for number in range(1000))
    install(world, whole)
    world.small_disk(UPDATE, 8192)
    assert world.run().status == 0
    world.only_platform()
    assert errors() == missing("0103")
    assert list(contents(UPDATE)) == ["platform.xml"]
    written = read(TARGET)
    assert whole.startswith(written) and len(written) <= 8192


def test_bytes_that_the_locale_cannot_convert(world):
    """The line is empty; the others are copied."""
    install(world, b"<a>\n<b gr\xf6\xdfe>\n<c>\n")
    assert world.run().status == 0
    assert read_bytes(TARGET) == b"<a>\n\n<c>\n"
