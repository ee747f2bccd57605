#!/usr/bin/env python3
"""The command lines of the pages: the fenced blocks of docs/*.md.

    tests/packaging/blocks.py installed    prints those that are to be run where the package is installed

A block's first line says where it is run: "sh" by a user of an installation, "sh tree" in the source tree (both by
test_docs.py), "sh installed" as root where the package is to be installed, "sh source" in the source tree, with its builds
(both by tests/full/package.sh).
"""

import pathlib
import re
import sys
import textwrap

ROOT = pathlib.Path(__file__).resolve().parents[2]
KINDS = ("sh", "sh tree", "sh installed", "sh source")


def pages():
    return sorted((ROOT / "docs").glob("*.md"))


def blocks(page):
    """[(kind, commands)] in the order of the page."""
    found = re.findall(r"^ *```(.*)\n((?:.*\n)*?) *```$", page.read_text(), re.M)
    return [(kind, textwrap.dedent(commands)) for kind, commands in found]


if __name__ == "__main__":
    print("".join(commands for page in pages() for kind, commands in blocks(page) if kind == "sh " + sys.argv[1]), end="")
