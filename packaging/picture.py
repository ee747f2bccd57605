#!/usr/bin/env python3
"""The picture of the README, docs/demo.svg: what ./demo prints, drawn like a terminal.

    packaging/picture.py         runs ./demo, and makes the picture anew from what it prints
    packaging/picture.py FILE    the same from a file that holds what ./demo has printed
"""

import pathlib
import re
import subprocess
import sys
from xml.sax.saxutils import escape

ROOT = pathlib.Path(__file__).resolve().parent.parent
PICTURE = ROOT / "docs" / "demo.svg"

LINES = 40   # a chapter that would begin after so many lines is shown as its heading alone
QUOTED = 8   # lines of a longer quotation that are shown, the one that tells of the others included

# The widest of the usual fonts needs this much for a character; with another the right margin is wider.
SIZE, ADVANCE = 14, 8.43
ROW, GAP = 19, 9  # the heights of a line and of an empty one
MARGIN, BAR = 22, 34

# It brings its own ground, so that it can be read on a light page and on a dark one.
STYLE = """\
    text { font: %dpx ui-monospace, SFMono-Regular, Menlo, Consolas, "DejaVu Sans Mono", "Liberation Mono", monospace;
           fill: #c9d1d9; white-space: pre }
    .heading { font-weight: bold; fill: #79c0ff }
    .command { fill: #7ee787 }
    .quoted { fill: #e6c98f }
    .left-out, .title { fill: #8b949e }
    .title { text-anchor: middle }
""" % SIZE

# After a letter, a digit, a dot or a tilde the slash belongs to a path that begins elsewhere.
ABSOLUTE = re.compile(r"(?<![\w.~])/[\w.]\S*")


def parse(output):
    """[(kind, line)] of all that ./demo printed, from its first heading on; "" is the kind of an empty line."""
    lines = output.splitlines()
    found = []
    for i, line in enumerate(lines):
        following = lines[i + 1] if i + 1 < len(lines) else ""
        if line and following == "-" * len(line):
            found.append(("heading", line))
        elif not found or (i and lines[i - 1] and line == "-" * len(lines[i - 1])):
            continue  # what the building of it printed, or the line below a heading
        elif not line.strip():
            found.append(("", ""))
        elif line.startswith("  | "):
            found.append(("quoted", line))
        elif line.startswith("$ "):
            found.append(("command", line))
        else:
            found.append(("plain", line))
    return found


def shorten_quotations(lines):
    shown, i = [], 0
    while i < len(lines):
        end = i + 1
        while lines[i][0] == "quoted" and end < len(lines) and lines[end][0] == "quoted":
            end += 1
        if end - i > QUOTED:
            shown += lines[i:i + QUOTED - 1]
            shown.append(("left-out", "  | ... and %d more lines" % (end - i - QUOTED + 1)))
        else:
            shown += lines[i:end]
        i = end
    return shown


def keep_headings_after(lines, limit):
    """The chapters that begin within the limit; of the others the headings."""
    shown, count, brief = [], 0, False
    for kind, line in lines:
        count += kind != ""
        brief = brief or (kind == "heading" and count > limit)
        if not brief or kind == "heading":
            shown += [("", "")] if brief and shown and shown[-1][0] else []
            shown.append((kind, line))
        elif kind and shown[-1][0] == "heading":
            shown.append(("left-out", "..."))
    while shown and not shown[-1][0]:
        shown.pop()
    return shown


def select(output):
    return keep_headings_after(shorten_quotations(parse(output)), LINES)


def render(lines):
    """The picture of [(kind, line)]."""
    width = round(2 * MARGIN + ADVANCE * max(len(line) for _, line in lines))
    y = BAR + SIZE + MARGIN // 2
    texts = []
    for kind, line in lines:
        if not kind:
            y += GAP
            continue
        texts.append('  <text class="%s" x="%d" y="%d">%s</text>\n' % (kind, MARGIN, y, escape(line)))
        y += ROW
    height = y - ROW + MARGIN
    return "".join([
        '<svg xmlns="http://www.w3.org/2000/svg" xml:space="preserve" role="img" width="%d" height="%d"' % (width, height),
        ' viewBox="0 0 %d %d">\n' % (width, height),
        "  <!-- Made by packaging/picture.py. -->\n",
        "  <title>What ./demo prints</title>\n",
        "  <style>\n%s  </style>\n" % STYLE,
        '  <rect x="0.5" y="0.5" width="%d" height="%d" rx="8" fill="#0d1117" stroke="#6e7681"/>\n' % (width - 1, height - 1),
        '  <path d="M1 %d H%d" stroke="#30363d"/>\n' % (BAR, width - 1),
        *('  <circle cx="%d" cy="%d" r="5.5" fill="%s"/>\n' % (MARGIN + 18 * i, BAR // 2, colour)
          for i, colour in enumerate(("#ff5f57", "#febc2e", "#28c840"))),
        '  <text class="title" x="%d" y="%d">./demo</text>\n' % (width // 2, BAR // 2 + 5),
        *texts,
        "</svg>\n"])


def picture(output):
    """The picture of what ./demo printed; SystemExit with the reason when that must not be shown."""
    lines = select(output)
    if not lines:
        sys.exit("error: there is no heading in what ./demo printed")
    for _, line in lines:
        if not line.isprintable():
            sys.exit("error: a line holds what cannot be drawn: %r" % line)
        if ABSOLUTE.search(line):
            sys.exit("error: a line holds a path of this machine: %s" % line)
    return render(lines)


def main(words):
    if len(words) > 1 or words[:1] in (["-h"], ["--help"]):
        sys.exit(__doc__)
    if words:
        output = pathlib.Path(words[0]).read_text(encoding="utf-8")
    else:
        done = subprocess.run([ROOT / "demo"], stdin=subprocess.DEVNULL, stdout=subprocess.PIPE, text=True, encoding="utf-8")
        if done.returncode != 0:
            sys.exit("error: ./demo ended with status %d" % done.returncode)
        output = done.stdout
    PICTURE.write_text(picture(output), encoding="utf-8")


if __name__ == "__main__":
    main(sys.argv[1:])
