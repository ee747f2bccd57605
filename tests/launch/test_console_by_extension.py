"""A console that nobody typed: the word comes from a configuration extension."""

from world import HEAD, INSTALL_AREA, STARTUP, areas, system


def test_the_console_variant_is_named(world):
    world.install("user", "jvm.location=/mnt/jvm/bin/javaw", "config.a.1=-console")
    world.write("/mnt/jvm/bin/java")
    world.run("-config", "a")
    assert world.only_platform().argv == (
        HEAD + ["-console"] + areas() + ["-vm", "/mnt/jvm/bin/java"] + STARTUP + system() + INSTALL_AREA)
