#!/usr/bin/env python3
"""The one direction of the folders: a file includes its own folder and the floors below it, from
the root of the tree; inside a folder there are no circles; a source includes its own header first.
"""
import os

from tree import FLOORS, Cpp, Problems, sources

problems = Problems()
known = set(sources())
below = {}  # subject (path without its ending): {subject of the same folder: (file, line)}

for name in sorted(known):
    folder = os.path.dirname(name)
    subject = os.path.splitext(name)[0]
    includes = list(Cpp(name).includes())
    for line, path, quoted in includes:
        if not quoted:
            if path.startswith(tuple(floor + "/" for floor in FLOORS)):
                problems.add(name, line, f"<{path}> is ours: include it with quotes")
            continue
        if path not in known:
            problems.add(name, line, f'"{path}" is no header of the tree, seen from its root')
            continue
        target = os.path.dirname(path)
        if FLOORS.index(target) > FLOORS.index(folder):
            problems.add(name, line, f'"{path}" lies above: {folder}/ must not know {target}/')
        other = os.path.splitext(path)[0]
        if target == folder and other != subject:
            below.setdefault(subject, {}).setdefault(other, (name, line))
    own = subject + ".h"
    if name.endswith(".cpp") and own in known:
        if not includes or includes[0][1] != own:
            problems.add(name, includes[0][0] if includes else 1,
                         f'"{own}" has to be the first include')


def circles(subject, path, done):
    if subject in path:
        ring = path[path.index(subject):] + [subject]
        where = below[ring[-2]][ring[-1]]
        problems.add(*where, "a circle: " + " -> ".join(ring))
        return
    if subject in done:
        return
    for other in sorted(below.get(subject, {})):
        circles(other, path + [subject], done)
    done.add(subject)


finished = set()
for start in sorted(below):
    circles(start, [], finished)
if not known:
    problems.add("launcher", 1, "no source was found")
problems.end()
