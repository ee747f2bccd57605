"""What bench/micro found, as the section of a page."""

from markdown import figure, table

# Of each benchmark: what it does, and what the number behind its name counts.
WHAT = {
    "readPlainPairs": ("reading a file of plain pairs", "pairs"),
    "readEscapedPairs": ("the same, with escapes in each value", "pairs"),
    "readContinuedPairs": ("the same, each value over three lines", "pairs"),
    "unescapePlainValue": ("unescaping a value without escapes", "characters"),
    "unescapeEscapedValue": ("unescaping a value full of them", "characters"),
    "resolveUserPlaceholders": ("resolving placeholders of properties", "placeholders"),
    "resolveStandardPlaceholders": ("resolving standard placeholders", "placeholders"),
    "resolveNoPlaceholder": ("a value without placeholders", "characters"),
    "foldPath": ("folding a path", "segments"),
    "toOsSeparator": ("turning backslashes", "characters"),
    "asciiToWide": ("bytes to wide text, ASCII", "characters"),
    "accentsToWide": ("bytes to wide text, others among them", "characters"),
    "asciiToBytes": ("wide text to bytes, ASCII", "characters"),
    "accentsToBytes": ("wide text to bytes, others among them", "characters"),
}


def _sized(benchmarks):
    """{name: {size: nanoseconds of the processor}}"""
    found = {}
    for one in benchmarks:
        if one.get("run_type") == "iteration":
            name, _, size = one["name"].partition("/")
            found.setdefault(name, {})[int(size)] = one["cpu_time"]
    return found


def _time(nanoseconds):
    for unit, factor in (("ms", 1e6), ("µs", 1e3)):
        if nanoseconds >= factor:
            return "%s %s" % (figure(nanoseconds / factor), unit)
    return "%s ns" % figure(nanoseconds)


def render(data):
    """The section, with a heading of the second level."""
    rows = [["function", "of", "smallest", "its time", "largest", "its time", "for each of the largest"]]
    for name, times in _sized(data["benchmarks"]).items():
        title, unit = WHAT[name]
        small, large = min(times), max(times)
        rows.append([title, unit, format(small, ","), _time(times[small]), format(large, ","), _time(times[large]),
                     "%s ns" % figure(times[large] / large)])
    return "\n".join(["## Single functions", "",
                      "Processor time, measured by Google Benchmark (`bench/micro`) in 64 bits; its packaged library "
                      "has no other width. The machine's load was %.1f before and %.1f after." % tuple(data["load"]), "",
                      table(*rows)])
