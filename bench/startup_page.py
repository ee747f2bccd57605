"""What bench/startup found, as tables of a page and as a chart."""

import html

from markdown import figure, spread, table

WIDTHS = {"native": "64 bits", "i686": "32 bits"}
REACHED = {True: "reached", False: "**not reached**"}

# Why a target cannot be reached, by the target's key.
NOTES = {
    "warm": "Where the least alone comes to the bound or above it, no launcher can reach it. A C program for just this "
            "start: {native} and {i686}.",
    "first": "As above, of the least.",
    "calls": "What a program makes that only sets its locale is in the table of counts.",
}


def ratios(result, name, key, limit="limit"):
    """How many times what the limit took in the same round: quartiles, the median between them."""
    pairs = zip(result["starts"][name][key], result["starts"][limit][key])
    return spread([mine / least for mine, least in pairs])


def ratio(result, name, key, limit="limit"):
    return ratios(result, name, key, limit)[1]


def shown_ratio(result, name, key):
    low, middle, high = ratios(result, name, key)
    return "%.2f (%.2f to %.2f)" % (middle, low, high)


def median(result, name, key):
    return spread(result["starts"][name][key])[1]


def label(result, name):
    """The title, with the width of an executable that comes in two."""
    for build, width in WIDTHS.items():
        if build in name.split("-"):
            whose = {build: "velmora, ", "static": "velmora with a static C library, "}.get(name.partition("-")[0], "")
            return "%s%s, %s" % (whose, result["starts"][name]["title"], width)
    return result["starts"][name]["title"]


def times_table(result):
    rows = [["a start", "to the child, ms", "times the limit (quartiles)", "to its own end, ms",
             "times the limit (quartiles)", "processor time, ms", "peak memory, KB", "page faults"]]
    for name, start in result["starts"].items():
        to_child = ["", ""]
        if None not in start["to_child"]:
            to_child = [figure(median(result, name, "to_child")), shown_ratio(result, name, "to_child")]
        rows.append([label(result, name), *to_child,
                     figure(median(result, name, "to_exit")), shown_ratio(result, name, "to_exit"),
                     figure(median(result, name, "cpu")), figure(int(median(result, name, "resident"))),
                     figure(int(median(result, name, "faults")))])
    return table(*rows)


def counts_table(result):
    rows = [["a start", "system calls", "up to the platform's exec", "with those of helpers", "instructions",
             "with those of helpers", "shared libraries", "helpers"]]
    for name, count in result["counts"].items():
        until = count["calls_until_platform"]
        rows.append([label(result, name), count["calls"], "" if until is None else until, count["calls_with_helpers"],
                     figure(count["instructions"]), figure(count["instructions_with_helpers"]),
                     len(count["libraries"]), count["helpers"]])
    return table(*rows)


def guarded(count):
    """The counts that are the same from start to start, but for very little."""
    return {"calls": count["calls"], "instructions": count["instructions"], "libraries": len(count["libraries"]),
            "helpers": count["helpers"]}


def disk_table(result):
    disk = result["disk"]
    titles = {"disk-memory": "in memory, not flushed", "disk-disk": "on the disk, not flushed",
              "disk-flushed": "on the disk, flushed"}
    rows = [["the user area", "to the child, ms (quartiles)", "to its own end, ms (quartiles)"]]
    for name, title in titles.items():
        cells = ["%s (%s to %s)" % tuple(figure(value) for value in (middle, low, high))
                 for low, middle, high in (spread(disk[name][key]) for key in ("to_child", "to_exit"))]
        rows.append([title, *cells])
    return table(*rows)


def flush_price(result):
    """Milliseconds that flushing adds to a first start, in the same round."""
    pairs = zip(result["disk"]["disk-flushed"]["to_child"], result["disk"]["disk-disk"]["to_child"])
    low, middle, high = spread([flushed - plain for flushed, plain in pairs])
    return "%s ms (quartiles %s to %s)" % (figure(middle), figure(low), figure(high))


def targets(result):
    """Each target: its key, what it says, the bound, the figure of each build, and that of the least, or None."""
    def times(name, limit="limit", what="to_child", least=None):
        return (lambda build: ratio(result, "%s-%s" % (build, name), what, limit.replace("BUILD", build)),
                least and (lambda build: ratio(result, "least-%s-%s" % (build, name), what, limit)))

    def count(key):
        figures = result["counts"]
        return (lambda build: figures[build + "-warm"][key]), (lambda build: figures["least-%s-warm" % build][key])

    def memory(name):
        return int(median(result, name, "resident"))

    def libraries(name):
        return len(result["counts"][name]["libraries"])

    return [
        ("warm", "a warm start to the child, times the limit", 1.5, *times("warm", least=True)),
        ("first", "a first start to the child, times the limit", 2.0, *times("first", least=True)),
        ("fatal", "a fatal end to its end, times a warm start's", 1.0, *times("fatal", "BUILD-warm", "to_exit")),
        ("beside", "beside a running platform to the child, times the limit after `ps` and `grep`", 1.15,
         *times("beside", "limit-ps", least=True)),
        ("dash", "a warm start to the child, times the dash script", 0.15, *times("warm", "dash", least=True)),
        ("jpackage", "a warm start to the child, times the `jpackage` launcher", 0.35,
         *times("warm", "jpackage", least=True)),
        ("calls", "a warm start's system calls", 120, *count("calls")),
        ("instructions", "a warm start's instructions", 1500000, *count("instructions")),
        ("memory", "a warm start's peak memory, KB", 4096, lambda build: memory(build + "-warm"),
         lambda build: memory("least-%s-warm" % build)),
        ("libraries", "a warm start's shared libraries, beside the loader", 1,
         lambda build: libraries(build + "-warm"), lambda build: libraries("least-%s-warm" % build)),
        ("helpers", "a warm start's helper processes", 0, *count("helpers")),
    ]


def target_rows(result):
    """Of every target: what it says, and the bound; for each width the figure, the least, and whether it is reached;
    the note."""
    plain = {build: figure(ratio(result, "plain-%s-warm" % build, "to_child")) for build in WIDTHS}
    for key, what, bound, measured, least in targets(result):
        found = [(measured(build), least(build) if least else None, measured(build) <= bound) for build in WIDTHS]
        yield what, bound, found, NOTES.get(key, "").format(**plain)


def targets_table(result):
    rows = [["target", "at most"]]
    for width in WIDTHS.values():
        rows[0] += [width, "the least, " + width, ""]
    rows[0].append("")
    for what, bound, found, note in target_rows(result):
        rows.append([what, figure(bound)])
        for value, least, reached in found:
            missed = not reached and figure(value) == figure(bound)  # by less than the digits show
            rows[-1] += ["%.3f" % value if missed else figure(value), "" if least is None else figure(least), REACHED[reached]]
        rows[-1].append(note)
    return table(*rows)


def load_text(result):
    before, after = (" ".join("%.2f" % part for part in load) for load in result["load"])
    first = "ahead of everything else that ran" if result["first"] else "beside everything else that ran"
    return "load average %s before, %s after; the starts ran %s" % (before, after, first)


def tables(result):
    """What was measured, all or some of it, for whoever ran the measurement."""
    texts = ["%d rounds; %s\n" % (result["rounds"], load_text(result)), times_table(result)]
    if "counts" in result:
        texts.append(counts_table(result))
    if "disk" in result:
        texts += [disk_table(result), "Flushing costs %s.\n" % flush_price(result)]
    if "counts" in result and {"native-warm", "native-first", "native-fatal", "limit-ps", "dash",
                               "jpackage", "least-native-warm", "plain-native-warm"} <= set(result["starts"]):
        texts.append(targets_table(result))
    return "\n".join(texts)


def chart(result):
    """Bars: the median to the child, times the limit; the thin line from quartile to quartile."""
    names = [name for name, start in result["starts"].items() if None not in start["to_child"]]
    bars = [(label(result, name), ratios(result, name, "to_child")) for name in names]
    left, width, step, top = 400, 480, 26, 46
    scale = width / max(high for _, (_, _, high) in bars)
    rows = []
    for at, (text, (low, middle, high)) in enumerate(bars):
        y = top + at * step
        colour = "#1f6feb" if text.startswith("velmora") else "#8c959f"
        rows.append(f'<text x="{left - 8}" y="{y + 14}" text-anchor="end">{html.escape(text.replace("`", ""))}</text>\n'
                    f'<rect x="{left}" y="{y + 2}" width="{middle * scale:.1f}" height="16" fill="{colour}"/>\n'
                    f'<path d="M{left + low * scale:.1f} {y + 10}H{left + high * scale:.1f}" stroke="#24292f"/>\n'
                    f'<text x="{left + high * scale + 6:.1f}" y="{y + 14}">{middle:.2f}</text>\n')
    height = top + len(bars) * step + 12
    one = left + scale
    return (f'<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 {left + width + 60} {height}" role="img" '
            f'font-family="sans-serif" font-size="13">\n'
            f'<title>Time to the child, times the limit</title>\n'
            f'<rect width="100%" height="100%" fill="#ffffff"/>\n'
            f'<text x="{left}" y="24" font-weight="bold">Time to the child, times the limit</text>\n'
            f'<path d="M{one:.1f} {top - 6}V{height - 8}" stroke="#cf222e" stroke-dasharray="4 3"/>\n'
            + "".join(rows) + "</svg>\n")
