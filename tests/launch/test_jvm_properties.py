"""Where the JVM's own properties are looked for, and what is added to them."""

import pytest

from world import APP, HEAD, INSTALL_AREA, STARTUP, areas, read, system, user_logs

NOT_FOUND = ('QVMRL0125I: No jvm.properties file was loaded. A default file should be at "${rcp.home}/rcp/deploy"\n')
SHOWN = ["-Dhome=${prop.java.home}", "-Droot=${prop.jvm.root}"]


def shown(world):
    """The words that the properties of this test add to the system properties."""
    argv = world.only_platform().argv
    return argv[argv.index("-Drcp.install.config=user") + 1:argv.index(*INSTALL_AREA)]


def loading(path):
    return 'QVMRL0077I: loading jvm.properties at "%s"\n' % path


def test_without_a_vm_it_lies_in_the_deploy_directory(world):
    """Then the JVM's home is the installation."""
    world.install()
    world.jvm_properties(*SHOWN)
    world.run()
    assert shown(world) == ["-Dhome=/mnt/app", "-Droot=/mnt/app/rcp/deploy/"]
    assert 'QVMRL0119I: VM specified is "external JVM"\n' + loading("/mnt/app/rcp/deploy/jvm.properties") in world.log()


def test_no_file_at_all(world):
    """The message is all there is to it."""
    world.install()
    assert world.run().status == 0
    assert world.only_platform().argv == HEAD + areas() + STARTUP + system() + INSTALL_AREA
    assert 'QVMRL0119I: VM specified is "external JVM"\n' + NOT_FOUND in world.log()


def test_no_file_and_so_no_home_of_the_jvm(world):
    world.install()
    world.base_properties("-Dhome=${prop.java.home}")
    world.fatal(world.run(), "QVMRL0088E: property substitution is invalid (${prop.java.home})")


def test_no_file_and_still_a_root(world):
    """The place where it should have been is known to placeholders all the same."""
    world.install()
    world.base_properties("-Droot=${prop.jvm.root}")
    world.run()
    assert shown(world) == ["-Droot=/mnt/app/rcp/deploy/"]


def test_no_file_and_the_library_path_stays_as_it_is(world):
    """It is only fixed up for a JVM whose file was read."""
    world.install()
    world.base_properties("jvm.library.path=lib", "-Dpath=${prop.jvm.library.path}")
    world.run()
    assert shown(world) == ["-Dpath=lib"]


def test_a_file_that_cannot_be_read_counts_as_absent(world):
    world.install()
    world.jvm_properties("-Dx=1")
    world.write(APP + "/rcp/deploy/jvm.properties", "-Dx=1\n", 0o000)
    assert world.run().status == 0
    assert shown(world) == []
    assert NOT_FOUND in world.log()


def test_the_jvm_of_a_plug_in(world):
    """Its file lies in the plug-in's own directory, which is the JVM's home."""
    vm = "/mnt/a/eclipse/plugins/jre.x/jre/bin/java"
    world.install("user", "jvm.location=" + vm)
    world.jvm_properties(*SHOWN, root="/mnt/a/eclipse/plugins/jre.x/")
    world.run()
    assert shown(world) == ["-Dhome=/mnt/a/eclipse/plugins/jre.x", "-Droot=/mnt/a/eclipse/plugins/jre.x/"]
    assert ('QVMRL0021I: VM specified is "%s"\n' % vm
            + loading("/mnt/a/eclipse/plugins/jre.x/jvm.properties")) in world.log()


def test_the_file_of_a_plug_in_is_looked_for_once(world):
    """And opened once more, to be read."""
    place = "/mnt/a/eclipse/plugins/jre.x/"
    world.install("user", "jvm.location=" + place + "jre/bin/java")
    world.jvm_properties(*SHOWN, root=place)
    world.run(strace=["-e", "trace=open,openat", "-P", place + "jvm.properties"])
    assert read("/dev/shm/strace").count("open") == 2


def test_the_home_of_a_plug_ins_jvm_does_not_replace_one_that_is_given(world):
    """It is appended, and the first one counts."""
    world.install("user", "jvm.location=/mnt/a/eclipse/plugins/jre.x/jre/bin/java")
    world.jvm_properties("java.home=/mnt/mine", *SHOWN, root="/mnt/a/eclipse/plugins/jre.x/")
    world.run()
    assert shown(world) == ["-Dhome=/mnt/mine", "-Droot=/mnt/a/eclipse/plugins/jre.x/"]


def test_a_plug_in_without_the_file_is_searched_like_any_directory(world):
    world.install("user", "jvm.location=/mnt/a/eclipse/plugins/jre.x/jre/bin/java")
    world.jvm_properties(*SHOWN, root="/mnt/a/eclipse/plugins/jre.x/jre/")
    world.run()
    assert shown(world) == ["-Dhome=/mnt/app", "-Droot=/mnt/a/eclipse/plugins/jre.x/jre/"]


@pytest.mark.parametrize("root", ["/mnt/o/myjvm/jvm/", "/mnt/o/myjvm/", "/mnt/o/"])
def test_a_jvm_in_a_directory_of_its_own(world, root):
    """One, two or three levels above the directory of the executable; the home is where "jvm/bin" begins."""
    world.install("user", "jvm.location=/mnt/o/myjvm/jvm/bin/java")
    world.jvm_properties(*SHOWN, root=root)
    world.run()
    assert shown(world) == ["-Dhome=/mnt/o/myjvm", "-Droot=" + root]


@pytest.mark.parametrize("root", ["/mnt/o/myjvm/jvm/bin/", "/mnt/"])
def test_neither_nearer_nor_further_away(world, root):
    world.install("user", "jvm.location=/mnt/o/myjvm/jvm/bin/java")
    world.jvm_properties("-Dwrong=1", root=root)
    world.jvm_properties(*SHOWN)
    world.run()
    assert shown(world) == ["-Dhome=/mnt/o/myjvm", "-Droot=/mnt/app/rcp/deploy/"]


def test_the_nearest_file_counts(world):
    world.install("user", "jvm.location=/mnt/o/myjvm/jvm/bin/java")
    for root in ("/mnt/o/myjvm/jvm/", "/mnt/o/myjvm/", "/mnt/o/", APP + "/rcp/deploy/"):
        world.jvm_properties("-Dat=" + root, root=root)
    world.run()
    assert shown(world) == ["-Dat=/mnt/o/myjvm/jvm/"]


def test_a_vm_without_any_directory(world):
    world.install("user", "jvm.location=java")
    world.jvm_properties(*SHOWN)
    world.run()
    assert shown(world) == ["-Dhome=/mnt/app", "-Droot=/mnt/app/rcp/deploy/"]


def test_a_path_with_fewer_directories_than_levels(world):
    """Two slashes are enough for the first level only; then the default place is taken."""
    world.install()
    world.jvm_properties(*SHOWN)
    world.run("-vm", "bin/sub/java")
    assert shown(world) == ["-Dhome=/mnt/app", "-Droot=/mnt/app/rcp/deploy/"]


def test_the_vm_of_the_line_decides_where_to_look(world):
    """Its first ${rcp.home} is replaced, its backslashes are turned."""
    world.install("user", "jvm.location=/mnt/o/jvm/bin/java")
    world.jvm_properties("-Dwrong=1", root="/mnt/o/jvm/")
    world.jvm_properties(*SHOWN, root=APP + "/j/jvm/")
    world.run("-vm", "${rcp.home}\\j\\jvm\\bin\\java")
    assert shown(world) == ["-Dhome=/mnt/app/j", "-Droot=/mnt/app/j/jvm/"]


def test_the_first_jvm_bin_of_the_path_ends_the_home(world):
    world.install("user", "jvm.location=/mnt/o/jvm/bin/more/jvm/bin/java")
    world.jvm_properties(*SHOWN)
    world.run()
    assert shown(world) == ["-Dhome=/mnt/o", "-Droot=/mnt/app/rcp/deploy/"]


def test_the_character_before_jvm_bin_is_lost_whatever_it_is(world):
    """Normally it is the separator."""
    world.install("user", "jvm.location=/mnt/o/myjvm/bin/java")
    world.jvm_properties(*SHOWN)
    world.run()
    assert shown(world) == ["-Dhome=/mnt/o/m", "-Droot=/mnt/app/rcp/deploy/"]


def test_a_path_that_begins_with_jvm_bin_gives_an_empty_home(world):
    world.install("user", "jvm.location=jvm/bin/java")
    world.jvm_properties(*SHOWN)
    world.run()
    assert shown(world) == ["-Dhome=", "-Droot=/mnt/app/rcp/deploy/"]


def test_a_home_that_is_given_is_kept(world):
    world.install("user", "jvm.location=/mnt/o/jvm/bin/java")
    world.jvm_properties(*SHOWN, "java.home=/mnt/mine")
    world.run()
    assert shown(world) == ["-Dhome=/mnt/mine", "-Droot=/mnt/app/rcp/deploy/"]


@pytest.mark.parametrize("users", [True, False])
def test_a_home_that_is_given_and_empty_is_kept(world, users):
    """In the user's file as in that of the JVM."""
    world.install("user", "jvm.location=/mnt/o/jvm/bin/java")
    world.base_properties(*(["java.home="] if users else []))
    world.jvm_properties(*SHOWN, *([] if users else ["java.home="]))
    world.run()
    assert shown(world) == ["-Dhome=", "-Droot=/mnt/app/rcp/deploy/"]


@pytest.mark.parametrize("home", ["/mnt/mine", ""])
def test_a_home_that_is_given_is_not_even_computed(world, home):
    """The trace would show the pair that is added."""
    world.install()
    world.jvm_properties("java.home=" + home)
    world.run("-debug")
    log = read(user_logs()[0])
    assert 'QVMRL0126I:   key = "jvm.root"\n' in log
    assert 'QVMRL0126I:   key = "java.home"\n' not in log


def test_a_root_that_is_given_is_kept(world):
    """The computed one is appended, and the first one counts."""
    world.install()
    world.base_properties("jvm.root=/mnt/mine")
    world.jvm_properties(*SHOWN)
    world.run()
    assert shown(world) == ["-Dhome=/mnt/app", "-Droot=/mnt/mine"]


@pytest.mark.parametrize("given, fixed", [
    ("lib", "/mnt/j/lib"),
    ("lib:bin", "/mnt/j/lib:/mnt/j/bin"),
    ("${prop.java.home}/bin", "/mnt/j/bin"),
    ("lib\\\\amd64", "/mnt/j/lib/amd64"),
    ("a:bb", "/mnt/j/bb"),
    ("a", ""),
    ("", ""),
    ("lib:bin:x", "/mnt/j/lib:/mnt/j/bin:"),
    ("lib:binary:xx", "/mnt/j/lib:/mnt/j/binary:"),
    ("aa::bb", "/mnt/j/aa:/mnt/j/:"),
])
def test_the_library_path_of_the_jvm(world, given, fixed):
    """Each entry is put below the JVM's home unless it names it. An entry of one character is dropped. The search goes
    on too far behind the second entry, so a third one is lost, though the separator in front of it stays."""
    world.install()
    world.jvm_properties("java.home=/mnt/j", "jvm.library.path=" + given, "-Dpath=${prop.jvm.library.path}")
    world.run()
    assert shown(world) == ["-Dpath=" + fixed]


def test_the_library_path_is_put_behind_the_first_text_that_reads_like_its_key(world):
    """Which may be a value: what stands behind that is a key then, and lost."""
    world.install()
    world.base_properties("q=jvm.library.path", "product=P", "jvm.library.path=lib")
    world.jvm_properties("java.home=/mnt/j", "-Dpath=${prop.jvm.library.path}")
    world.run()
    assert shown(world) == ["-Dpath=lib"]
    assert "-product" not in world.only_platform().argv
