"""Tables and figures as the pages show them."""

import statistics


def table(*rows):
    """The first row is the head."""
    lines = ["| " + " | ".join(str(cell) for cell in row) + " |" for row in rows]
    return "\n".join([lines[0], "|" + "---|" * len(rows[0])] + lines[1:]) + "\n"


def spread(values):
    """The lower quartile, the median, the upper quartile."""
    return tuple(statistics.quantiles(values, n=4, method="inclusive"))


def figure(value):
    """Three digits that mean something; whole numbers with their thousands apart."""
    if isinstance(value, int) or value >= 100:
        return f"{round(value):,}"
    return "%.1f" % value if value >= 10 else "%.2f" % value
