#!/usr/bin/env python3
"""Writes a design that shows every type of element, as an exported project: showcase.py FILE.xml

It also shows how another program can make such a file: elements are XML, texts and pictures are in it as base64.
"""

import base64
import math
import struct
import sys
import xml.etree.ElementTree as xml
import zlib

DARK, BLUE, RED, GOLD, GREEN = (32, 40, 60), (45, 95, 165), (190, 60, 50), (230, 175, 60), (70, 140, 90)
WHITE, GREY = (255, 255, 255), (150, 155, 165)
SOLID, DOT, LONG_DASH, TRANSPARENT = 100, 101, 102, 106
LEFT, CENTER, RIGHT, JUSTIFIED = 1, 2, 3, 4


def number(value):
    return f"{value:g}"


# Values


def colour(parent, tag, rgb, alpha=255):
    names = ("red", "green", "blue", "alpha")
    xml.SubElement(parent, tag, {name: str(value) for name, value in zip(names, (*rgb, alpha))})


def brush(parent, rgb):
    node = xml.SubElement(parent, "brush", style=str(SOLID if rgb else TRANSPARENT))
    colour(node, "color", rgb or WHITE)


def pen(parent, rgb, width=0.4, style=SOLID):
    node = xml.SubElement(parent, "pen", style=str(style if rgb else TRANSPARENT), width=number(width))
    colour(node, "color", rgb or DARK)


def attachment(parent, tag, data, **attributes):
    node = xml.SubElement(parent, tag, attributes)
    xml.SubElement(node, "base64").text = base64.b64encode(data).decode()


def rich_text(parent, paragraphs, size=9, rgb=DARK, align=LEFT, face="DejaVu Sans"):
    """Each paragraph is a text, or a list of (text, attributes) with a style for each piece."""
    root = xml.Element("richtext", version="1.0.0.0", xmlns="http://www.wxwidgets.org")
    layout = xml.SubElement(
        root,
        "paragraphlayout",
        textcolor="#%02X%02X%02X" % rgb,
        fontpointsize=str(size),
        fontstyle="90",
        fontweight="400",
        fontunderlined="0",
        fontface=face,
        alignment=str(align),
    )
    for paragraph in [paragraphs] if isinstance(paragraphs, str) else paragraphs:
        node = xml.SubElement(layout, "paragraph")
        for text, style in [(paragraph, {})] if isinstance(paragraph, str) else paragraph:
            xml.SubElement(node, "text", style).text = f'"{text}"'
    attachment(parent, "attachment-richtextbuffer", xml.tostring(root, "UTF-8", xml_declaration=True))


def picture(pixel, width, height):
    """A PNG file; `pixel` returns red, green, blue and alpha for a place from 0 to 1."""
    rows = b""
    for y in range(height):
        rows += b"\0" + bytes(part for x in range(width) for part in pixel((x + 0.5) / width, (y + 0.5) / height))
    chunk = lambda name, data: struct.pack(">I", len(data)) + name + data + struct.pack(">I", zlib.crc32(name + data))
    header = struct.pack(">IIBBBBB", width, height, 8, 6, 0, 0, 0)
    return b"\x89PNG\r\n\x1a\n" + chunk(b"IHDR", header) + chunk(b"IDAT", zlib.compress(rows, 9)) + chunk(b"IEND", b"")


def sunset(x, y):
    if math.hypot(x - 0.35, (y - 0.55) * 0.75) < 0.16 and y < 0.66:
        return 255, 235, 150, 255
    if y > 0.66 + 0.02 * math.sin(x * 19):
        shine = 40 if abs(x - 0.35) < 0.1 + (y - 0.66) * 0.4 and int(y * 60) % 2 else 0
        return 30 + shine, 60 + shine, 110 + shine // 2, 255
    return int(70 + 180 * y), int(60 + 120 * y * y), int(130 - 40 * y), 255


def badge(x, y):
    """A ring with a transparent surrounding."""
    radius = math.hypot(x - 0.5, y - 0.5)
    alpha = max(0, min(255, int((0.49 - radius) * 25000)))
    return (*(GOLD if radius > 0.36 or radius < 0.12 else RED), alpha)


# Elements


def element(parent, tag, left, top, width, height, rotation=0, **attributes):
    node = xml.SubElement(parent, tag, coloured="true", rotation=number(rotation), visible="true", **attributes)
    xml.SubElement(node, "center", x=number(left + width / 2), y=number(top + height / 2))
    xml.SubElement(node, "size", width=number(width), height=number(height))
    return node


def shape(
    parent, kind, left, top, width, height, fill, line=None, rotation=0, gradient=None, form=None, style=SOLID, **more
):
    node = element(parent, "shape", left, top, width, height, rotation, shape=kind, **more)
    if gradient:
        child = xml.SubElement(node, "gradient")
        colour(child, "start", gradient[0])
        colour(child, "end", gradient[1])
    brush(node, fill)
    pen(node, line, 0.7 if style == DOT else 0.4, style)
    if form:
        xml.SubElement(node, "free-form", name=f"freeform.{form}")
    return node


def text(parent, left, top, width, height, paragraphs, rotation=0, tag="text", circle=None, **style):
    more = {"circle-type": circle} if circle else {}
    rich_text(element(parent, tag, left, top, width, height, rotation, **more), paragraphs, **style)


def image(parent, left, top, width, height, data, rotation=0, **attributes):
    node = element(parent, "image", left, top, width, height, rotation, **attributes)
    attachment(node, "attachment-bitmap", data, extension="png")
    return node


def line(parent, tag, start, end, rgb=None, width=0.4, style=SOLID):
    left, top = min(start[0], end[0]), min(start[1], end[1])
    node = element(parent, tag, left, top, abs(end[0] - start[0]), abs(end[1] - start[1]))
    for name, point in (("start", start), ("end", end)):
        xml.SubElement(node, name, x=number(point[0]), y=number(point[1]))
    if rgb:
        pen(node, rgb, width, style)


def label(parent, left, top, width, height, words, size=8, weight=400, rgb=DARK):
    node = element(parent, "label", left, top, width, height, text=words)
    xml.SubElement(
        node, "font", name="DejaVu Sans", pointsize=str(size), style="90", weight=str(weight), underlined="false"
    )
    colour(node, "color", rgb)


def table(parent, left, top, width, height, columns, rows):
    node = element(parent, "table", left, top, width, height)
    row_nodes, col_nodes = xml.SubElement(node, "rows"), xml.SubElement(node, "cols")
    for _ in rows:
        xml.SubElement(row_nodes, "row", height=number(height / len(rows)))
    for share in columns:
        xml.SubElement(col_nodes, "col", width=number(width * share), visible="true")
    cells = xml.SubElement(node, "cells")
    for i, row in enumerate(rows):
        for j, words in enumerate(row):
            cell = xml.SubElement(cells, "cell", {"margin": "0.5", "vertical-align": "center"})
            style = {"fontweight": "700"} if i == 0 else {}
            rich_text(cell, [[(words, style)]], 8, BLUE if i == 0 else DARK, RIGHT if j == len(row) - 1 else LEFT)


def design(target, width, height):
    document = xml.SubElement(xml.SubElement(target, "item"), "graphic-document", version="1")
    box = {"left": "0", "top": "0", "width": number(width), "height": number(height)}
    xml.SubElement(document, "bounding-box", box)
    xml.SubElement(document, "content-box", box)
    return document


# The designs


def front(target):
    """Shapes and pictures, one of each kind with its name below."""
    page = design(target, 121, 121)
    element(page, "paper", 0, 0, 121, 121)
    shape(page, "rectangle", 0, 0, 121, 121, WHITE, gradient=((226, 234, 246), WHITE))
    title = [[("Every element ", {"fontweight": "700"}), ("on one cover", {"fontstyle": "93"})]]
    text(page, 6, 4, 109, 12, title, size=18, align=CENTER)

    cells = [(8 + 37 * (i % 3), 19 + 25 * (i // 3)) for i in range(12)]
    names = ["rectangle", "circle", "ellipse, gradient", "rounded rectangle", "star", "triangle, turned"]
    names += ["trapeze, dotted", "image", "transparent image", "mirror", "arrow, line", "dimension"]
    for (x, y), name in zip(cells, names):
        label(page, x, y + 19, 31, 4, name, 7, rgb=GREY)
    node = element(page, "rectangle", cells[0][0] + 2, cells[0][1], 27, 17)
    brush(node, BLUE)
    pen(node, DARK, 0.6)
    node = element(page, "circle", cells[1][0] + 6, cells[1][1], 18, 18)
    brush(node, GOLD)
    pen(node, RED, 1)
    shape(page, "ellipse", cells[2][0] + 2, cells[2][1], 27, 17, None, DARK, gradient=(GOLD, RED))
    shape(page, "rounded-rectangle", cells[3][0] + 2, cells[3][1], 27, 17, GREEN, DARK, **{"corner-radius": "5"})
    shape(page, "free-form", cells[4][0] + 6, cells[4][1], 19, 18, GOLD, DARK, form="star")
    shape(page, "free-form", cells[5][0] + 8, cells[5][1] + 1, 14, 14, RED, DARK, rotation=30, form="triangle")
    shape(page, "free-form", cells[6][0] + 3, cells[6][1] + 1, 25, 16, (240, 240, 245), BLUE, form="trapeze", style=DOT)
    image(page, cells[7][0] + 3, cells[7][1], 25, 18, picture(sunset, 400, 288))
    image(page, cells[8][0] + 6, cells[8][1], 18, 18, picture(badge, 240, 240), rotation=15)

    x, y = cells[9]
    word = [[("Reflection", {"fontweight": "700"})]]
    text(page, x + 2, y + 1, 27, 8, word, size=12, rgb=BLUE, align=CENTER)
    node = element(page, "mirror", x + 2, y + 8.5, 27, 8)
    inner = xml.SubElement(node, "graphic-document", version="1")
    text(inner, x + 2, y + 1, 27, 8, word, size=12, rgb=BLUE, align=CENTER)

    x, y = cells[10]
    line(page, "arrow", (x + 3, y + 15), (x + 27, y + 3), RED, 0.8)
    line(page, "line", (x + 3, y + 3), (x + 27, y + 16), BLUE, 0.6, LONG_DASH)
    x, y = cells[11]
    line(page, "dimension", (x + 3, y + 8), (x + 28, y + 8), DARK)
    label(page, x + 12, y + 2, 12, 4, "25 mm", 8)
    # Seen in the editor only: a vertex of a free form, a place for an image, and a button.
    element(page, "point", 60, 60, 1, 1)
    element(page, "dummy", 0, 0, 10, 10)
    element(page, "state-button", 100, 112, 18, 6, label="Edit", hint="Changes the cover")


def back(target):
    """Texts in all alignments, a table, and elements that are turned, mirrored and grey."""
    page = design(target, 151, 118)
    shape(page, "rectangle", 0, 0, 151, 118, (250, 248, 242))
    spine = [[("Every element  ", {"fontweight": "700"}), ("Tonewright", {})]]
    for left, rotation in ((-56, 270), (89, 90)):
        shape(page, "rectangle", 0 if left < 0 else 145, 0, 6, 118, DARK)
        text(page, left, 56.5, 118, 5, spine, rotation, size=9, rgb=WHITE, align=CENTER)
    text(page, 12, 6, 127, 9, "Texts and tables", size=16, rgb=BLUE)
    words = "Lines are broken in millimetres, so they are the same on a screen, on paper and in a picture"
    words += " of any resolution."
    for i, (align, name) in enumerate(((LEFT, "Left"), (CENTER, "Center"), (RIGHT, "Right"), (JUSTIFIED, "Justified"))):
        paragraphs = [[(f"{name}: ", {"fontweight": "700"}), (words, {})]]
        text(page, 12 + 32 * i, 18, 29, 20, paragraphs, size=7, align=align)
    rows = [("Title", "Performer", "Time"), ("Morning", "The Example Trio", "3:25")]
    rows += [("Noon, a long title that takes two lines", "The Example Trio", "4:10"), ("Evening", "A Singer", "5:02")]
    table(page, 12, 46, 82, 36, (0.45, 0.37, 0.18), rows)
    pieces = [("Bold", {"fontweight": "700"}), (", ", {}), ("italic", {"fontstyle": "93"}), (", ", {})]
    pieces += [("underlined", {"fontunderlined": "1"}), (", ", {}), ("red", {"textcolor": "#BE3C32"})]
    pieces += [(" and ", {}), ("large", {"fontpointsize": "14"})]
    text(page, 12, 88, 82, 9, [pieces])
    words = ["Other scripts: Größe, Ελληνικά, Русский", "$title stands for the title of the disc."]
    text(page, 12, 98, 82, 14, words, size=8)

    data = picture(sunset, 400, 288)
    variants = (("turned", {}), ("mirrored", {"mirror-x": "true"}), ("grey", {"coloured": "false"}))
    for i, (name, more) in enumerate(variants):
        node = image(page, 107, 54 + 20 * i, 24, 16, data, rotation=20 if i == 0 else 0)
        for key, value in more.items():
            node.set(key, value)
        label(page, 132, 61 + 20 * i, 12, 4, name, 6, rgb=GREY)


def disc(target):
    """A label with texts on circles."""
    page = design(target, 117, 117)
    node = element(page, "circle", 0, 0, 117, 117)
    brush(node, (236, 240, 246))
    pen(node, GREY, 0.2)
    image(page, 33.5, 64, 50, 36, picture(sunset, 400, 288))
    text(page, 5, 5, 107, 107, "Every element on one disc", 0, "text-circle", "convex", size=16, rgb=BLUE)
    text(page, 5, 5, 107, 107, "made by a program, shown by another", 180, "text-circle", "concav", size=9)
    text(page, 33, 20, 51, 12, [[("Showcase", {"fontweight": "700"})]], size=20, rgb=RED, align=CENTER)
    node = element(page, "circle", 38, 38, 41, 41)
    brush(node, WHITE)
    pen(node, GREY, 0.2)


def main():
    if len(sys.argv) != 2 or sys.argv[1].startswith("-"):
        sys.exit("usage: showcase.py FILE.xml")
    root = xml.Element("project", {"version": "2", "creator": "showcase.py"})
    root.attrib |= {"print-cutmarks": "true", "print-coloured": "true"}
    content = xml.SubElement(root, "content", {"title": "Every element", "sub-title": "", "type": "audio"})
    xml.SubElement(content, "items")
    case = xml.SubElement(root, "jewel-case")
    front(case)
    back(case)
    disc(xml.SubElement(root, "disc"))
    xml.indent(root)
    xml.ElementTree(root).write(sys.argv[1], "UTF-8", xml_declaration=True)


if __name__ == "__main__":
    main()
