"""Tables: rows of text as Markdown that reads well in a terminal too."""


def markdown(header, rows):
    """The first column is text, the others are numbers."""
    cells = [list(map(str, row)) for row in [header, *rows]]
    widths = [max(len(row[column]) for row in cells) for column in range(len(header))]

    def line(row):
        texts = [text.ljust(width) if index == 0 else text.rjust(width)
                 for index, (text, width) in enumerate(zip(row, widths))]
        return "| " + " | ".join(texts) + " |"

    rule = "|" + "|".join("-" * (width + 2) if index == 0 else "-" * (width + 1) + ":"
                          for index, width in enumerate(widths)) + "|"
    return "\n".join([line(cells[0]), rule, *map(line, cells[1:])])


def number(value):
    """Three figures that count, with commas between the thousands."""
    if value >= 100:
        return f"{value:,.0f}"
    return f"{value:.1f}" if value >= 10 else f"{value:.2f}"


def seconds(value):
    """A duration in the unit that fits."""
    for unit, factor in (("s", 1), ("ms", 1e3), ("µs", 1e6)):
        if value * factor >= 1:
            return f"{number(value * factor)} {unit}"
    return f"{number(value * 1e9)} ns"
