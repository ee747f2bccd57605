"""What bench/growth found, as the section of a page and as a chart."""

import html
import math

COLOURS = ("#1f6feb", "#cf222e", "#1a7f37", "#9a6700", "#8250df", "#bf3989", "#0a7ea4", "#57606a")


def exponent_reached(curve, data):
    return curve["exponent"] is not None and curve["exponent"] <= data["targets"]["exponent"]


def floor_reached(found, data):
    return found["ratio"] <= data["targets"]["floor"]


def all_reached(data):
    return (all(exponent_reached(curve, data) for curve in data["curves"]) and
            all(floor_reached(found, data) for found in data["floor"].values()))


def _said(reached):
    return "reached" if reached else "**not reached**"


def _seconds(value):
    return "%.2f ms" % (value * 1000) if value < 0.01 else "%.1f ms" % (value * 1000)


def _row(cells):
    return "| " + " | ".join(cells) + " |"


def _exponent(value):
    return "none" if value is None else "%.2f" % value


def _curve_rows(data):
    yield _row(["What grows", "Width", "Nothing", "10", "1,000", "Largest", "Exponent", "Last decade",
                "In processor time", "At most %.1f" % data["targets"]["exponent"]])
    yield _row(["---", "---"] + ["---:"] * 7 + ["---"])
    for curve in data["curves"]:
        times = {size: _seconds(seconds) for size, seconds in curve["points"]}
        largest = max(times)
        yield _row([curve["name"], curve["width"], _seconds(curve["constant"]), times.get(10, ""), times.get(1000, ""),
                    "%s (%s)" % (times[largest], format(largest, ",")), _exponent(curve["exponent"]),
                    _exponent(curve["last_decade"]), _exponent(curve["processor_exponent"]), _said(exponent_reached(curve, data))])


def _floor_rows(data):
    yield _row(["Width", "The floor", "A whole start", "Ratio", "Middle half", "In processor time",
                "At most %.1f" % data["targets"]["floor"]])
    yield _row(["---"] + ["---:"] * 5 + ["---"])
    for width, found in data["floor"].items():
        yield _row([width, _seconds(found["floor"]), _seconds(found["start"]), "%.2f" % found["ratio"],
                    "%.2f to %.2f" % tuple(found["quartiles"]), "%.2f" % found["processor_ratio"], _said(floor_reached(found, data))])


def render(data):
    """The section, with a heading of the second level."""
    lines = ["## How a start grows", "",
             "Time from the launcher's exec to its end, on a file system in memory: the medians of %d rounds, the "
             "starts of a round in random order. Each start was seen to work: the platform got every word it should, "
             "what was to be removed is gone. The machine's load was %.1f before and %.1f after."
             % (data["rounds"], *data["load"]), "",
             "The exponent is the slope of a straight line, by least squares in logarithms, through what the medians "
             "have above the start with nothing to do, as far as that is at least half as much. That of the last decade "
             "compares the largest size with a tenth of it.", "",
             *_curve_rows(data)]
    if data["floor"]:
        size = next(iter(data["floor"].values()))["properties"]
        lines += ["", "A start with %s properties, compared with a C program that reads the same file with the same "
                  "scanning format, converts each line, and does nothing else (the ratio of each round):"
                  % format(size, ","), "", *_floor_rows(data)]
    return "\n".join(lines) + "\n"


def chart(data, width="native"):
    """The curves of one width in an SVG with logarithmic axes: seconds above the constant."""
    curves = [curve for curve in data["curves"] if curve["width"] == width]
    points = {curve["name"]: [(math.log10(size), math.log10(seconds - curve["constant"]))
                              for size, seconds in curve["points"] if seconds - curve["constant"] > 1e-5]
              for curve in curves}
    every = [point for row in points.values() for point in row]
    if not every:
        return ""
    low, high = math.floor(min(y for _, y in every)), math.ceil(max(y for _, y in every))
    left, top, wide, tall = 70, 20, 420, 300

    def place(x, y):
        return left + (x - 1) / 4 * wide, top + (high - y) / max(1, high - low) * tall

    parts = ['<svg xmlns="http://www.w3.org/2000/svg" viewBox="0 0 740 360" font-family="sans-serif" font-size="12">',
             '<rect width="740" height="360" fill="#ffffff"/>']
    for decade in range(1, 6):
        x, y = place(decade, low)
        parts.append('<path d="M%.0f %d V%.0f" stroke="#d0d7de"/>' % (x, top, y))
        parts.append('<text x="%.0f" y="%.0f" text-anchor="middle">%s</text>' % (x, y + 18, format(10 ** decade, ",")))
    for decade in range(low, high + 1):
        x, y = place(1, decade)
        parts.append('<path d="M%.0f %.0f h%d" stroke="#d0d7de"/>' % (x, y, wide))
        parts.append('<text x="%.0f" y="%.0f" text-anchor="end">%g ms</text>' % (x - 6, y + 4, 10 ** (decade + 3)))
    for number, (name, row) in enumerate(points.items()):
        colour = COLOURS[number % len(COLOURS)]
        shown = " ".join("%.1f,%.1f" % place(x, y) for x, y in row)
        parts.append('<polyline points="%s" fill="none" stroke="%s" stroke-width="2"/>' % (shown, colour))
        parts.append('<text x="510" y="%d" fill="%s">%s</text>' % (40 + 22 * number, colour, html.escape(name)))
    return "\n".join([*parts, "</svg>"]) + "\n"
