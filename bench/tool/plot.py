# SPDX-FileCopyrightText: the libjni_kyface_api authors
# SPDX-License-Identifier: Apache-2.0
"""Cost by picture size, as an SVG with nothing but the standard library."""

import dataclasses
import math
from xml.sax.saxutils import escape

COLOURS = ["#1f6feb", "#b35900", "#1a7f37"]
TEXT = "#24292f"
GRID = "#d0d7de"
PANEL_WIDTH, PANEL_HEIGHT = 420, 260
LEFT, TOP, RIGHT, BOTTOM = 48, 44, 104, 44


@dataclasses.dataclass
class Panel:
    """One diagram: what it shows, and [(name, [(width, height, value)])]."""

    title: str
    series: list


def svg(panel):
    width = LEFT + PANEL_WIDTH + RIGHT
    height = TOP + PANEL_HEIGHT + BOTTOM
    return "\n".join([
        f'<svg xmlns="http://www.w3.org/2000/svg" width="{width}" height="{height}" viewBox="0 0 {width} {height}" '
        f'font-family="sans-serif" font-size="12" fill="{TEXT}">',
        f'<rect width="{width}" height="{height}" fill="#ffffff"/>',
        f'<g transform="translate({LEFT} {TOP})">',
        *_panel(panel),
        "</g>",
        "</svg>",
    ]) + "\n"


def _panel(panel):
    sizes = [(width, height) for width, height, _ in panel.series[0][1]]
    pixels = [math.log2(width * height) for width, height in sizes]
    top_value = _round_up(max(value for _, points in panel.series for _, _, value in points))

    def x_of(width, height):
        return (math.log2(width * height) - pixels[0]) / (pixels[-1] - pixels[0]) * PANEL_WIDTH

    def y_of(value):
        return PANEL_HEIGHT * (1 - value / top_value)

    yield f'<text x="0" y="-20" font-size="14" font-weight="bold">{escape(panel.title)}</text>'
    for step in range(5):
        value = top_value * step / 4
        y = y_of(value)
        yield f'<line x1="0" x2="{PANEL_WIDTH}" y1="{y:.1f}" y2="{y:.1f}" stroke="{GRID}"/>'
        yield f'<text x="-8" y="{y + 4:.1f}" text-anchor="end">{value:g}</text>'
    for width, height in sizes:
        x = x_of(width, height)
        yield f'<text x="{x:.1f}" y="{PANEL_HEIGHT + 18}" text-anchor="middle">{width}</text>'
        yield f'<text x="{x:.1f}" y="{PANEL_HEIGHT + 32}" text-anchor="middle">x {height}</text>'
    # A series has its colour in every diagram. Names stand at the ends of their lines, moved apart where these are close.
    last = math.inf
    for colour, (name, points) in sorted(zip(COLOURS, panel.series), key=lambda series: series[1][1][-1][2]):
        line = " ".join(f"{x_of(width, height):.1f},{y_of(value):.1f}" for width, height, value in points)
        yield f'<polyline points="{line}" fill="none" stroke="{colour}" stroke-width="2"/>'
        for width, height, value in points:
            yield f'<circle cx="{x_of(width, height):.1f}" cy="{y_of(value):.1f}" r="3" fill="{colour}"/>'
        last = min(y_of(points[-1][2]) + 4, last - 16)
        yield f'<text x="{PANEL_WIDTH + 10}" y="{last:.1f}" fill="{colour}">{escape(name)}</text>'


def _round_up(value):
    """The next number of one or two digits whose quarters are short."""
    unit = 10 ** math.floor(math.log10(value))
    return next(unit * factor for factor in (1, 1.2, 1.6, 2, 2.4, 3.2, 4, 6, 8, 10) if unit * factor >= value)
