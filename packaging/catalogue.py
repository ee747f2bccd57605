#!/usr/bin/env python3
"""Messages, options and properties: the pages that are made from docs/*.toml, and whether those files and the code agree.

    packaging/catalogue.py --write    makes the pages anew
    packaging/catalogue.py --check    compares: code, files, pages; one line for each problem, status 1 when there is one
"""

import pathlib
import re
import sys
import textwrap
import tomllib

HERE = pathlib.Path(__file__).resolve()
ROOT = HERE.parent.parent
DATE = "2026-11-21"  # of the pages; changed by hand, with their text

sys.dont_write_bytecode = True
sys.path.insert(0, str(ROOT / "tests" / "lint"))
from tree import Cpp, FLOORS  # noqa: E402

NUMBER = re.compile(r"QVMRL(?:\d{4}|00XX)[EIW]")

# ---- The code ---------------------------------------------------------------------------------------------------------

LOG_CALLS = {"Output", "SvcDebugOutA", "SvcDebugOutW", "SvcDebugLastError", "fatalError", "fatalErrorA", "fatalErrorW"}
TRACE_CALLS = {"Output", "SvcDebugOutA", "SvcDebugOutW", "SvcDebugLastError"}

# Where a text is not handed to the log at its own place: whether the start ends with what the log is given there.
HANDED_ON = {
    "makeUserDirectory": True,   # launcher/user_area/first_launch.cpp
    "endWith": True,             # launcher/user_area/workspace_reset.cpp
    "renewConfiguration": True,  # the same: hands it to endWith
    "write": True,               # launcher/user_area/startup_arguments.cpp, Record
    "insertWord": True,          # launcher/properties/vmarg_map.cpp
    "newExecArguments": False,   # launcher/command/launch_command.cpp
    "snprintf": True,            # platform/linux/process.cpp, into tempOutBuffer for fatalErrorA
    "return": True,              # platform/linux/files.cpp, copyText
    "trouble": True,             # platform/linux/files.cpp, copyFileAside
    "JVM_FEATURE": False,        # launcher/user_area/platform_xml.cpp
    "PARENT_FEATURE": False,     # the same
}


def decoded(literal):
    """The characters of a literal."""
    return re.sub(r"\\(.)", lambda found: {"n": "\n", "t": "\t"}.get(found.group(1), found.group(1)), literal)


class Source:
    def __init__(self, path, shown):
        self.cpp, self.shown = Cpp(str(path)), shown

    def literals(self):
        """(line, characters, wide or not, offset of its end, offset of its beginning), neighbours joined."""
        joined = []
        for start, end, inside in self.cpp.strings:
            if joined and not self.cpp.code[joined[-1][1]:start].strip():
                joined[-1][1:] = [end, joined[-1][2] + inside]
            else:
                joined.append([start, end, inside])
        for start, end, inside in joined:
            yield self.cpp.line(start), decoded(inside), self.cpp.text[start] == "L", start, end

    def caller(self, offset):
        """(the word in front of the innermost open bracket, or what the text is given to; offset of the statement's end)."""
        code, depth = self.cpp.code, 0
        for i in range(offset - 1, -1, -1):
            c = code[i]
            if c == ")" or c == "}":
                depth += 1
            elif c in "({":
                if depth:
                    depth -= 1
                    continue
                before = code[:i].rstrip()
                named = re.search(r"(\w+)\s*=?$", before) if c == "{" and before.endswith("=") else \
                    re.search(r"(\w+)$", before) if c == "(" else None
                if named:
                    return named.group(1)
                break
            elif c == ";" and depth == 0:
                break
        start = max(code.rfind(mark, 0, offset) for mark in ";{}") + 1
        named = re.search(r"\b(\w+)(?:\s*=)?\s*$", code[start:offset])
        return named.group(1) if named else ""

    def statement(self, end):
        return self.cpp.code[end:self.cpp.code.index(";", end)]


def sources(root):
    for floor in FLOORS:
        for path in sorted((root / floor).iterdir()):
            if path.suffix in (".cpp", ".h"):
                yield Source(path, "%s/%s" % (floor, path.name))


def log_texts(found_sources, problems):
    """{text: (place, whether it ends the start)} of everything that reaches the log."""
    texts = {}
    for source in found_sources:
        if source.shown.startswith("diag/self_format"):
            continue
        for line, text, _, start, end in source.literals():
            caller = source.caller(start)
            first = source.cpp.code[:start].rstrip().endswith("(")
            if not NUMBER.search(text) and (caller not in LOG_CALLS or not first or text in ("%s", "")):
                continue
            place = "%s:%d" % (source.shown, line)
            statement = source.statement(end)
            if caller in TRACE_CALLS:
                ends = False
            elif caller in LOG_CALLS and "EXIT_PROCESS" in statement:
                ends = True
            elif caller in LOG_CALLS and "GO_ON" in statement:
                ends = False
            elif caller in HANDED_ON:
                ends = HANDED_ON[caller]
            else:
                problems.append('%s: it cannot be told whether "%s" ends the start; it is given to "%s"'
                                % (place, text, caller))
                continue
            if texts.setdefault(text, (place, ends))[1] != ends:
                problems.append('%s: "%s" ends the start at one place and not at the other' % (place, text))
    return texts


OPTION = re.compile(r"--?[A-Za-z][\w./:=-]*")
KEY = re.compile(r"-?[A-Za-z][\w.%-]*")


def wide_words(found_sources):
    """{wide literal that looks like an option, a key or a variable: place}."""
    words = {}
    for source in found_sources:
        for line, text, wide, _, _ in source.literals():
            if wide and "QVMRL" not in text and (OPTION.fullmatch(text) or KEY.fullmatch(text)):
                words.setdefault(text, "%s:%d" % (source.shown, line))
    return words


def looked_up(found_sources):
    """{what a lookup of properties is given as a literal: place}."""
    keys = {}
    for source in found_sources:
        for line, text, wide, start, _ in source.literals():
            named = re.search(r"\b(?:findProperty|findProperties|replaceValue|FoundProperties\s+\w+)\(\s*$",
                              source.cpp.code[:start])
            if wide and named:
                keys.setdefault(text, "%s:%d" % (source.shown, line))
    return keys


# ---- The files --------------------------------------------------------------------------------------------------------

FIELDS = {
    "message": ({"text", "ends", "logged", "means", "causes", "action"}, set()),
    "option": ({"word", "to_platform", "effect"}, {"literal", "value"}),
    "written": ({"word", "effect"}, set()),
    "variable": ({"name", "effect"}, set()),
    "property": ({"key", "files", "type", "default", "reader", "text", "example"}, {"literals"}),
}
FILES = ["launcher", "user", "jvm", "args", "computed"]


class Catalogue:
    def __init__(self, root):
        self.problems = []
        self.tables = {}
        self.not_keys = []
        for name in ("messages", "options", "properties"):
            with open(root / "docs" / (name + ".toml"), "rb") as file:
                read = tomllib.load(file)
            if name == "properties":
                self.not_keys = read.pop("not_keys")
            for kind, entries in read.items():
                if kind not in FIELDS:
                    self.problems.append("docs/%s.toml: there is no kind [[%s]]" % (name, kind))
                    continue
                self.tables[kind] = entries
                needed, allowed = FIELDS[kind]
                for entry in entries:
                    shown = entry.get("text" if kind == "message" else "key", entry.get("word", entry.get("name")))
                    if not needed <= entry.keys() <= needed | allowed:
                        self.problems.append('docs/%s.toml: "%s" has other fields than it should' % (name, shown))
                    for field, value in entry.items():
                        if value in ("", []):
                            self.problems.append('docs/%s.toml: "%s": %s is empty' % (name, shown, field))
        for message in self["message"]:
            if message["logged"] not in ("always", "debug"):
                self.problems.append('docs/messages.toml: "%s": logged' % message["text"])
            if message["ends"] and message["logged"] != "always":
                self.problems.append('docs/messages.toml: "%s" ends the start and is always logged' % message["text"])
            if re.match(r"\n?QVMRL\d{4}E", message["text"]) and message["logged"] != "always":
                self.problems.append('docs/messages.toml: "%s": every line of an error is logged' % message["text"])
        for entry in self["property"]:
            if not set(entry["files"]) <= set(FILES):
                self.problems.append('docs/properties.toml: "%s": files' % entry["key"])

    def __getitem__(self, kind):
        return self.tables.get(kind, [])


def twice(names, shown, problems):
    seen = set()
    for name in names:
        if name in seen:
            problems.append('%s: "%s" stands there twice' % (shown, name))
        seen.add(name)


def compare(found, known, page, what, problems):
    """Both ways. `found` is {name: place in the code}."""
    for name, place in sorted(found.items()):
        if name not in known:
            problems.append('%s: %s has no entry for the %s "%s"' % (place, page, what, name))
    for name in sorted(known):
        if name not in found:
            problems.append('%s: the %s "%s" is nowhere in the code' % (page, what, name))


def disagreements(root):
    """What the files and the code do not agree about."""
    catalogue = Catalogue(root)
    problems = catalogue.problems
    found_sources = list(sources(root))

    texts = log_texts(found_sources, problems)
    known = {message["text"]: message for message in catalogue["message"]}
    twice([message["text"] for message in catalogue["message"]], "docs/messages.toml", problems)
    compare({text: place for text, (place, _) in texts.items()}, known, "docs/messages.toml", "text", problems)
    for text, (place, ends) in texts.items():
        if text in known and known[text]["ends"] != ends:
            problems.append('%s: "%s" %s the start' % (place, text, "ends" if ends else "does not end"))

    words = wide_words(found_sources)
    option_words = [entry.get("literal", entry["word"]) for entry in catalogue["option"]]
    option_words += [entry["word"] for entry in catalogue["written"]]
    variables = [entry["name"] for entry in catalogue["variable"]]
    keys = {literal for entry in catalogue["property"] for literal in entry.get("literals", [entry["key"]])}
    prefixes = {key for key in keys if OPTION.fullmatch(key)}  # lines that are options of the JVM
    twice([entry["word"] for entry in catalogue["option"]], "docs/options.toml, option", problems)
    twice([entry["word"] for entry in catalogue["written"]], "docs/options.toml, written", problems)
    twice([entry["key"] for entry in catalogue["property"]], "docs/properties.toml", problems)
    twice(catalogue.not_keys, "docs/properties.toml, not_keys", problems)

    options = {word: place for word, place in words.items() if OPTION.fullmatch(word) and word not in prefixes}
    compare(options, {word for word in option_words if OPTION.fullmatch(word)}, "docs/options.toml", "word", problems)
    others = {word: place for word, place in words.items() if word not in options}
    capital = {word: place for word, place in others.items() if re.fullmatch(r"[A-Z_]{4,}", word)}
    compare(capital, set(variables), "docs/options.toml", "variable", problems)
    rest = {word: place for word, place in others.items() if word not in capital}
    compare(rest, keys | set(catalogue.not_keys), "docs/properties.toml", "key", problems)
    for word in sorted(keys & set(catalogue.not_keys)):
        problems.append('docs/properties.toml: "%s" is a key and none' % word)
    for key, place in looked_up(found_sources).items():
        if key not in keys:
            problems.append('%s: docs/properties.toml has no entry for the key "%s", which is looked up' % (place, key))
    for word in (word for word in option_words if not OPTION.fullmatch(word)):
        if word not in words:
            problems.append('docs/options.toml: the word "%s" is nowhere in the code' % word)
    if not texts or not options or not keys:
        problems.append("the code, or docs/*.toml, is empty")
    return problems


# ---- The pages --------------------------------------------------------------------------------------------------------

def number_of(message):
    found = NUMBER.search(message["text"])
    return found.group() if found else ""


def roff(text):
    """Plain text for man."""
    text = text.replace("\\", "\\e").replace("-", "\\-").replace("^", "\\(ha").replace("~", "\\(ti").replace('"', "\\(dq")
    return re.sub(r"^([.'])", r"\\&\1", text, flags=re.M)


def sentences(text):
    """Each sentence on a line of its own, as man wants it; long ones are filled."""
    out = []
    for piece in re.split(r"(?<=[.;:!?)])\s+(?=[A-Z(\"])", text.strip()):
        out += [roff(line) for line in textwrap.wrap(piece, 66, break_on_hyphens=False, break_long_words=False)]
    return "\n".join(out)


def header(name, section, title):
    return '.\\" Made by packaging/catalogue.py. Do not edit.\n.TH %s %s %s "velmora" "%s"\n' % (
        name, section, DATE, title)


def shown_text(message):
    return [line for line in message["text"].strip("\n").split("\n") if line]


def ordered(messages):
    """By number; those without one at the end, in the order of the file."""
    return sorted(messages, key=lambda message: (number_of(message) == "", number_of(message)))


def end_words(message):
    if message["ends"]:
        return "Ends the start with status 255."
    return "" if message["logged"] == "always" else "Only with -debug."


def messages_man(catalogue, template):
    out = []
    for message in ordered(catalogue["message"]):
        for i, line in enumerate(shown_text(message)):
            out.append(".T%s\n.B \"%s\"" % ("Q" if i else "P", roff(line.rstrip())))
        out.append(sentences((end_words(message) + " " + message["means"]).strip()))
        if message["causes"] != "-debug.":
            out.append(".br\n.IR Causes :\n" + sentences(message["causes"]))
        if message["action"] != "Nothing.":
            out.append(".br\n.IR Action :\n" + sentences(message["action"]))
    return template.replace("@MESSAGES@", "\n".join(out))


def messages_markdown(catalogue):
    out = ["# Messages", "", "<!-- Made by packaging/catalogue.py from docs/messages.toml. Do not edit. -->", "",
           "Every line that velmora writes into its log, by its number. Search this page for the number. Where a value",
           "stands in the log, the text has `%s`, `%ls` or `%d`. Lines of an error are logged always, and those that",
           "end the start go on with \" : \" and the system's reason.", ""]
    for message in ordered(catalogue["message"]):
        number = number_of(message)
        out.append("## %s" % (number or "`%s`" % message["text"]))
        out.append("")
        if number:
            out += ["    " + line for line in shown_text(message)] + [""]
        for name, text in (("", end_words(message) + " " + message["means"]), ("Causes: ", message["causes"]),
                           ("Action: ", message["action"])):
            text = re.sub(r"([<>*_])", r"\\\1", name + text.strip())
            out += textwrap.wrap(text, 120, break_on_hyphens=False, break_long_words=False) + [""]
    return "\n".join(out).rstrip("\n") + "\n"


def option_man(catalogue, template):
    options = []
    for entry in catalogue["option"]:
        word = entry["word"]
        if "value" in entry:
            options.append(".TP\n.BI %s \" %s\"" % (roff(word), roff(entry["value"])))
        else:
            options.append(".TP\n.B %s" % roff(word))
        options.append(sentences(entry["effect"]))
        options.append(".br\n" + sentences("Passed on to the platform: %s." % entry["to_platform"]))
    written = [".TP\n.B %s\n%s" % (roff(entry["word"]), sentences(entry["effect"])) for entry in catalogue["written"]]
    variables = [".TP\n.B %s\n%s" % (roff(entry["name"]), sentences(entry["effect"])) for entry in catalogue["variable"]]
    return template.replace("@OPTIONS@", "\n".join(options)).replace("@WRITTEN@", "\n".join(written)) \
        .replace("@ENVIRONMENT@", "\n".join(variables))


def property_man(catalogue, template):
    for file in FILES:
        out = []
        for entry in catalogue["property"]:
            if file not in entry["files"]:
                continue
            out.append(".TP\n.B %s" % roff(entry["key"]))
            if file != entry["files"][0]:
                out.append("See above.")
                continue
            out.append(sentences(entry["text"]))
            out.append(".br\n.IR Type :\n" + sentences(entry["type"] + "."))
            out.append(".br\n.IR Default :\n" + sentences(entry["default"] + "."))
            out.append(".br\n.IR \"Read by\" :\n" + sentences(entry["reader"] + "."))
            out.append(".br\n.IR Example :\n.B %s" % roff(entry["example"]))
        template = template.replace("@%s@" % file.upper(), "\n".join(out))
    return template


def pages(root):
    """{path: text} of every page that is made."""
    catalogue = Catalogue(root)
    man = root / "packaging" / "man"
    made = {"docs/messages.md": messages_markdown(catalogue)}
    for name, section, title, fill in (
            ("velmora", 1, "User Commands", option_man),
            ("velmora.properties", 5, "File Formats", property_man),
            ("velmora-messages", 7, "Miscellaneous Information", messages_man)):
        file = "%s.%d" % (name, section)
        template = (man / (file + ".in")).read_text()
        text = header(name.upper().replace("-", "\\-"), section, title) + fill(catalogue, template)
        if re.search(r"@[A-Z]+@", text):
            raise SystemExit("catalogue: a place in %s.in was not filled" % file)
        made["packaging/man/" + file] = text.rstrip("\n") + "\n"
    return made


def stale(root):
    problems = []
    for name, text in pages(root).items():
        path = root / name
        if not path.is_file() or path.read_text() != text:
            problems.append("%s: is not what docs/*.toml says; packaging/catalogue.py --write makes it" % name)
    return problems


def main(words):
    if words == ["--write"]:
        for name, text in pages(ROOT).items():
            (ROOT / name).write_text(text)
        return 0
    if words == ["--check"]:
        problems = disagreements(ROOT) + stale(ROOT)
        print("".join(problem + "\n" for problem in problems), end="")
        return 1 if problems else 0
    print(__doc__, file=sys.stderr)
    return 2


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
