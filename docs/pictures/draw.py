#!/usr/bin/env python3
# SPDX-License-Identifier: Apache-2.0
"""Draws architecture.svg from the table of layers in docs/architecture.md: a band for each layer, a box for each part.

    docs/pictures/draw.py           draws it anew
    docs/pictures/draw.py --check   fails if the table says something else by now
"""
import html
import itertools
import pathlib
import sys

HERE = pathlib.Path(__file__).resolve().parent
PAGE = HERE.parent / "architecture.md"
PICTURE = HERE / "architecture.svg"
WIDTH, LABEL, BAND, GAP, BOX, MARGIN = 960, 130, 92, 26, 12, 16
CHARACTER = 6.1  # wide, of most fonts
COLOURS = ("#dbeafe", "#e0e7ff", "#ede9fe", "#dcfce7", "#fef9c3", "#ffedd5", "#fee2e2", "#e5e7eb")
STYLE = ("text{fill:#111827} .layer{font-weight:600;font-size:14px} .part{font-weight:600;font-size:14px}"
         " .where{font-size:12px;fill:#4b5563} .what{font-size:12px}"
         " .arrow{stroke:#4b5563;stroke-width:1.5;marker-end:url(#head)}")


def layers():
    """(layer, its (part, where, what)) in the order of the page."""
    lines = itertools.dropwhile(lambda line: not line.startswith("| layer |"), PAGE.read_text().splitlines())
    rows = [[cell.strip().replace("`", "") for cell in line.strip("|").split("|")]
            for line in itertools.takewhile(lambda line: line.startswith("|"), lines)]
    return [(name, [row[1:] for row in group]) for name, group in itertools.groupby(rows[2:], lambda row: row[0])]


def text(kind, x, y, words, anchor="middle"):
    return f'<text class="{kind}" x="{x:g}" y="{y:g}" text-anchor="{anchor}">{html.escape(words)}</text>'


def drawn(bands):
    height = 2 * MARGIN + len(bands) * (BAND + GAP) - GAP
    shapes = []
    for number, (name, parts) in enumerate(bands):
        top = MARGIN + number * (BAND + GAP)
        shapes.append(f'<rect x="{MARGIN}" y="{top}" width="{WIDTH - 2 * MARGIN}" height="{BAND}" rx="10" '
                      f'fill="{COLOURS[number % len(COLOURS)]}"/>')
        shapes.append(text("layer", MARGIN + BOX, top + BAND / 2 + 5, name, "start"))
        left = MARGIN + LABEL
        width = (WIDTH - MARGIN - left) / len(parts)
        for place, (part, where, what) in enumerate(parts):
            x = left + place * width
            shapes.append(f'<rect x="{x:g}" y="{top + BOX}" width="{width - BOX:g}" height="{BAND - 2 * BOX}" rx="6" '
                          'fill="#ffffff" stroke="#9ca3af"/>')
            centre = x + (width - BOX) / 2
            for line, (kind, words) in enumerate((("part", part), ("where", where), ("what", what))):
                if len(words) * CHARACTER > width - BOX:
                    sys.exit(f"{PAGE.name}: this is too long for its box: {words}")
                shapes.append(text(kind, centre, top + BOX + 20 + 19 * line, words))
        if number > 0 and not name.startswith("for "):
            middle = left + (WIDTH - MARGIN - left - BOX) / 2
            shapes.append(f'<line class="arrow" x1="{middle:g}" y1="{top - GAP + 3}" x2="{middle:g}" y2="{top - 3}"/>')
    return "\n".join([
        f'<svg xmlns="http://www.w3.org/2000/svg" width="{WIDTH}" height="{height}" viewBox="0 0 {WIDTH} {height}" '
        'font-family="system-ui, Segoe UI, Helvetica, Arial, sans-serif">',
        "<title>The layers, from clients to adapters</title>", f"<style>{STYLE}</style>",
        '<defs><marker id="head" viewBox="0 0 8 8" refX="7" refY="4" markerWidth="7" markerHeight="7" '
        'orient="auto"><path d="M0 0L8 4L0 8z" fill="#4b5563"/></marker></defs>',
        '<rect width="100%" height="100%" rx="8" fill="#ffffff"/>', *shapes, "</svg>", ""])


picture = drawn(layers())
if sys.argv[1:] != ["--check"]:
    PICTURE.write_text(picture)
elif picture != PICTURE.read_text():
    sys.exit(f"{PAGE.name} says something else than {PICTURE.name}; draw it anew with docs/pictures/draw.py")
