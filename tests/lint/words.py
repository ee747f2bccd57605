#!/usr/bin/env python3
"""Words that have no business in the project: names of documents that a reader of the clone does
not have, paths and hosts of the machine that somebody happened to work on, and signatures.

Looked at: the text and the name of every file, and every commit message. The patterns are put
together from pieces, so that this file does not hold what it looks for.
"""
import re
import subprocess

from tree import Problems, files

SPEC = "spe" + "c"
WORDS = [
    (rf"\b{SPEC}ification", "a document that the clone does not have"),
    (rf"\bthe[ \t]+{SPEC}s?\b", "a document that the clone does not have"),
    (rf"\b{SPEC}\.md\b", "a document that the clone does not have"),
    (r"(?<![\w./])\.\./" + "shared", "a folder that the clone does not have"),
    (r"\baccept" + r"ance[ \t]+(?:worlds?|cases?|suite)\b", "a folder that the clone does not have"),
    (r"(?-i:\bPart" + r"s?[ \t]+[0-9]+(?:\.[0-9]+)?\b)", "a document that the clone does not have"),
    (r"(?-i:\bPart" + r"s\b)", "a document that the clone does not have"),
    (r"(?<![\w.}$/-])/(?:wo" + r"rk|ro" + r"ot|fa" + r"rm)/[\w.-]", "a path of one machine"),
    (r"/tmp/te" + r"am\b", "a path of one machine"),
    (r"(?<![\w.}$-])/ho" + r"me/(?!anna\b)[a-z][\w.-]*/", "a path of one machine"),
    (r"https?://(?!www\.[\w.]+/doc/)[\w.-]*\b(?:de" + r"bian|ubu" + r"ntu|py" + r"pi|mirr" + r"or|pro" + r"xy)[\w.-]*",
     "a host that packages come from"),
    (r"\b[\w-]+\.(?:inter" + r"nal|lo" + r"cal|corp)(?:\b(?![\w./-])|:\d)", "a host of one network"),
    (r"(?-i:\bA" + r"I\b)|\bLL" + r"M\b|co-auth" + r"ored-by", "a signature"),
]
PATTERN = [(re.compile(pattern, re.I), why) for pattern, why in WORDS]
NAME = re.compile(rf"(?:^|[/_.-]){SPEC}s?(?:[/_.-]|$)", re.I)

problems = Problems()
names = files()
for name in names:
    if NAME.search(name):
        problems.add(name, 1, "the file's name stands for a document that the clone does not have")
    with open(name, "rb") as file:
        data = file.read()
    if b"\0" in data:
        continue
    for number, line in enumerate(data.decode("utf-8", "replace").splitlines(), 1):
        for pattern, why in PATTERN:
            found = pattern.search(line)
            if found:
                problems.add(name, number, f'"{found.group()}": {why}')

log = subprocess.run(["git", "log", "--format=%x00%h%x01%B"], capture_output=True, check=False)
for entry in log.stdout.decode("utf-8", "replace").split("\0")[1:]:
    commit, _, message = entry.partition("\1")
    for number, line in enumerate(message.splitlines(), 1):
        for pattern, why in PATTERN:
            found = pattern.search(line)
            if found:
                problems.add(f"commit {commit}", number, f'"{found.group()}": {why}')
if not names:
    problems.add(".", 1, "no file was found")
problems.end()
