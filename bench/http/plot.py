"""Plots as SVG: bars side by side, and lines over two logarithmic scales."""

import math
from xml.sax.saxutils import escape

COLOURS = ("#3b6ea8", "#e08b3a", "#5a9e5a", "#b0508f", "#7a6a4f", "#4a9fa8")
FONT = 'font-family="DejaVu Sans, Helvetica, Arial, sans-serif"'


class Picture:
    """Elements on a white ground, in pixels from the upper left corner."""

    def __init__(self, width, height):
        self.width = width
        self.height = height
        self._parts = []

    def text(self, x, y, words, size=12, anchor="start", colour="#222", weight="normal"):
        self._parts.append(
            f'<text x="{x:.1f}" y="{y:.1f}" font-size="{size}" text-anchor="{anchor}" '
            f'fill="{colour}" font-weight="{weight}">{escape(words)}</text>')

    def bar(self, x, y, width, height, colour):
        self._parts.append(f'<rect x="{x:.1f}" y="{y:.1f}" width="{max(0.5, width):.1f}" '
                           f'height="{height:.1f}" fill="{colour}"/>')

    def line(self, points, colour, width=1.0, dashes=""):
        path = " ".join(f"{x:.1f},{y:.1f}" for x, y in points)
        dash = f' stroke-dasharray="{dashes}"' if dashes else ""
        self._parts.append(f'<polyline points="{path}" fill="none" stroke="{colour}" '
                           f'stroke-width="{width}"{dash}/>')

    def dot(self, x, y, colour):
        self._parts.append(f'<circle cx="{x:.1f}" cy="{y:.1f}" r="3" fill="{colour}"/>')

    def svg(self):
        return (f'<svg xmlns="http://www.w3.org/2000/svg" width="{self.width}" '
                f'height="{self.height}" viewBox="0 0 {self.width} {self.height}" {FONT}>\n'
                f'<rect width="100%" height="100%" fill="#fff"/>\n' +
                "\n".join(self._parts) + "\n</svg>\n")


def bars(title, groups, legend, unit):
    """`groups` is a list of (heading, [(label, [value of each legend entry])]); a value
    that is None was not measured."""
    rows = [row for _, group in groups for row in group]
    top = max((value for _, values in rows for value in values if value), default=1)
    thick, left, wide = 12, 270, 480
    height = 76 + sum(30 + len(group) * (thick * len(legend) + 8) for _, group in groups)
    picture = Picture(left + wide + 100, height)
    picture.text(16, 26, title, 15, weight="bold")
    for index, name in enumerate(legend):
        picture.bar(16 + index * 170, 40, 12, 12, COLOURS[index])
        picture.text(34 + index * 170, 50, name)
    picture.text(left + wide + 84, 50, unit, anchor="end", colour="#666")
    y = 70
    for heading, group in groups:
        picture.text(16, y + 14, heading, 13, weight="bold")
        y += 24
        for label, values in group:
            picture.text(left - 8, y + thick * len(legend) / 2 + 4, label, anchor="end")
            for index, value in enumerate(values):
                width = wide * (value or 0) / top
                picture.bar(left, y, width, thick - 1, COLOURS[index])
                words = "not measured" if value is None else f"{value:,.0f}"
                picture.text(left + width + 5, y + thick - 2, words, 10, colour="#444")
                y += thick
            y += 8
        y += 6
    return picture.svg()


class _Scale:
    """Maps values to pixels, by their logarithm; whole powers of ten at the ends."""

    def __init__(self, values, begin, end):
        self.low = math.floor(math.log10(min(values)) + 1e-9)
        self.high = max(self.low + 1, math.ceil(math.log10(max(values)) - 1e-9))
        self._begin, self._end = begin, end

    def __call__(self, value):
        part = (math.log10(value) - self.low) / (self.high - self.low)
        return self._begin + part * (self._end - self._begin)

    def powers(self):
        return [10.0 ** power for power in range(self.low, self.high + 1)]


def _panel(picture, x, y, width, height, panel):
    """(title, name of x, [(series, [(x, seconds)])]) with the axes of its own."""
    title, what, series = panel
    points = [point for _, line in series for point in line]
    left, right, top, bottom = x + 62, x + width - 26, y + 30, y + height - 46
    across = _Scale([n for n, _ in points], left, right)
    up = _Scale([cost for _, cost in points], bottom, top)
    picture.text(x + 8, y + 16, title, 13, weight="bold")
    for power in across.powers():
        picture.line([(across(power), top), (across(power), bottom)], "#ddd")
        picture.text(across(power), bottom + 15, short(power), 10, "middle", "#555")
    for power in up.powers():
        picture.line([(left, up(power)), (right, up(power))], "#ddd")
        picture.text(left - 5, up(power) + 4, duration(power), 10, "end", "#555")
    picture.text((left + right) / 2, bottom + 31, what, 11, "middle", "#444")
    for index, (name, line) in enumerate(series):
        colour = COLOURS[index]
        picture.line([(across(n), up(cost)) for n, cost in line], colour, 2)
        for n, cost in line:
            picture.dot(across(n), up(cost), colour)
        picture.bar(left + 8, top + 4 + 15 * index, 9, 9, colour)
        picture.text(left + 22, top + 12 + 15 * index, name, 10)


def short(value):
    for unit, factor in (("M", 1e6), ("k", 1e3)):
        if value >= factor:
            return f"{value / factor:g}{unit}"
    return f"{value:g}"


def duration(value):
    for unit, factor in (("s", 1), ("ms", 1e-3), ("µs", 1e-6)):
        if value >= factor * 0.999:
            return f"{value / factor:g} {unit}"
    return f"{value / 1e-9:g} ns"


def panels(title, content, columns=2):
    width, height = 420, 270
    rows = math.ceil(len(content) / columns)
    picture = Picture(width * columns, 40 + height * rows)
    picture.text(16, 26, title, 15, weight="bold")
    for index, panel in enumerate(content):
        _panel(picture, width * (index % columns), 40 + height * (index // columns), width, height,
               panel)
    return picture.svg()
