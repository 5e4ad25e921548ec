#!/usr/bin/python3
"""Draws the sample apps' icons and artwork. Needed only to change one: the pictures are in the repository.

usage: samples/draw_icons.py      (Debian package python3-cairo)

Icons fill their square; the device rounds the corners. All drawing is in a square of side 1.
"""
import math
import pathlib

import cairo

HERE = pathlib.Path(__file__).resolve().parent
ICON_SIZE = 240
ARTWORK_SIZE = 480


def rgb(text):
    return tuple(int(text[index:index + 2], 16) / 255 for index in (0, 2, 4))


def colour(context, text, alpha=1.0):
    context.set_source_rgba(*rgb(text), alpha)


def backdrop(context, top, bottom):
    gradient = cairo.LinearGradient(0, 0, 0.25, 1)
    gradient.add_color_stop_rgb(0, *rgb(top))
    gradient.add_color_stop_rgb(1, *rgb(bottom))
    context.set_source(gradient)
    context.paint()


def disc(context, x, y, radius):
    context.new_path()
    context.arc(x, y, radius, 0, 2 * math.pi)
    context.fill()


def polygon(context, points):
    context.new_path()
    for x, y in points:
        context.line_to(x, y)
    context.close_path()
    context.fill()


def rounded_bar(context, x, y, width, height, radius):
    context.new_path()
    context.arc(x + width - radius, y + radius, radius, -math.pi / 2, 0)
    context.arc(x + width - radius, y + height - radius, radius, 0, math.pi / 2)
    context.arc(x + radius, y + height - radius, radius, math.pi / 2, math.pi)
    context.arc(x + radius, y + radius, radius, math.pi, 3 * math.pi / 2)
    context.close_path()
    context.fill()


def stroke(context, width):
    context.set_line_width(width)
    context.set_line_cap(cairo.LINE_CAP_ROUND)
    context.set_line_join(cairo.LINE_JOIN_ROUND)
    context.stroke()


def tides(context):
    backdrop(context, "ffd9a0", "f2806b")
    colour(context, "fff6e0")
    disc(context, 0.5, 0.46, 0.19)
    for level, height, shift, shade in ((0.50, 0.045, 0.0, "2a9bb5"), (0.62, 0.05, 0.35, "1b7a9c"),
                                        (0.76, 0.055, 0.7, "105a80")):
        colour(context, shade)
        context.new_path()
        context.move_to(0, 1)
        for step in range(101):
            x = step / 100
            context.line_to(x, level + height * math.sin(2 * math.pi * (1.5 * x + shift)))
        context.line_to(1, 1)
        context.close_path()
        context.fill()


def kettle(context):
    backdrop(context, "e8a15b", "b4532a")
    colour(context, "fff3e2", 0.75)
    for x in (0.38, 0.50, 0.62):
        context.new_path()
        context.move_to(x, 0.40)
        context.curve_to(x - 0.07, 0.31, x + 0.07, 0.25, x, 0.15)
        stroke(context, 0.035)
    colour(context, "fffaf2")
    context.new_path()
    context.arc(0.735, 0.575, 0.085, 0, 2 * math.pi)
    stroke(context, 0.05)
    context.new_path()
    context.move_to(0.22, 0.47)
    context.line_to(0.74, 0.47)
    context.curve_to(0.74, 0.70, 0.66, 0.78, 0.56, 0.78)
    context.line_to(0.40, 0.78)
    context.curve_to(0.30, 0.78, 0.22, 0.70, 0.22, 0.47)
    context.fill()
    rounded_bar(context, 0.22, 0.825, 0.52, 0.045, 0.022)
    colour(context, "8a3a1b")
    rounded_bar(context, 0.26, 0.50, 0.44, 0.035, 0.017)


def metronome(context):
    backdrop(context, "6b3fa0", "2d1b52")
    colour(context, "f3e9ff")
    polygon(context, ((0.40, 0.16), (0.60, 0.16), (0.76, 0.84), (0.24, 0.84)))
    colour(context, "c9a9f0")
    polygon(context, ((0.285, 0.66), (0.715, 0.66), (0.76, 0.84), (0.24, 0.84)))
    colour(context, "2d1b52")
    for row in range(5):
        rounded_bar(context, 0.47, 0.24 + row * 0.075, 0.06, 0.018, 0.009)
    colour(context, "ff8a5c")
    context.new_path()
    context.move_to(0.50, 0.74)
    context.line_to(0.74, 0.18)
    stroke(context, 0.035)
    disc(context, 0.655, 0.38, 0.062)
    colour(context, "2d1b52")
    disc(context, 0.50, 0.74, 0.04)


def star(context, x, y, radius):
    points = []
    for corner in range(8):
        length = radius if corner % 2 == 0 else radius * 0.36
        angle = corner * math.pi / 4
        points.append((x + length * math.sin(angle), y - length * math.cos(angle)))
    polygon(context, points)


def almanac(context):
    backdrop(context, "24356e", "0b1130")
    context.push_group()
    colour(context, "ffe9a8")
    disc(context, 0.46, 0.52, 0.29)
    context.set_operator(cairo.OPERATOR_CLEAR)
    disc(context, 0.585, 0.44, 0.25)
    context.pop_group_to_source()
    context.paint()
    colour(context, "ffffff")
    star(context, 0.62, 0.42, 0.085)
    star(context, 0.80, 0.26, 0.05)
    star(context, 0.76, 0.64, 0.06)
    colour(context, "ffffff", 0.8)
    for x, y in ((0.16, 0.20), (0.36, 0.13), (0.90, 0.46), (0.60, 0.86), (0.84, 0.85), (0.12, 0.80)):
        disc(context, x, y, 0.012)


def ledger(context):
    backdrop(context, "35c29a", "0b7d6b")
    for x, height, shade in ((0.19, 0.22, "d4fff0"), (0.37, 0.36, "a8f5dc"), (0.55, 0.29, "d4fff0"),
                             (0.73, 0.52, "ffffff")):
        colour(context, shade)
        rounded_bar(context, x - 0.03, 0.82 - height, 0.14, height, 0.03)
    colour(context, "ffd24a")
    context.new_path()
    for x, y in ((0.20, 0.52), (0.40, 0.36), (0.58, 0.43), (0.80, 0.19)):
        context.line_to(x, y)
    stroke(context, 0.04)
    for x, y in ((0.20, 0.52), (0.40, 0.36), (0.58, 0.43), (0.80, 0.19)):
        disc(context, x, y, 0.04)


def leaf(context, x, y, length, angle):
    context.save()
    context.translate(x, y)
    context.rotate(angle)
    context.new_path()
    context.move_to(0, 0)
    context.curve_to(length * 0.25, -length * 0.55, length * 0.8, -length * 0.5, length, 0)
    context.curve_to(length * 0.8, length * 0.22, length * 0.25, length * 0.22, 0, 0)
    context.fill()
    context.restore()


def verdant(context):
    backdrop(context, "f4f7d9", "cfe3a3")
    colour(context, "4f8f3a")
    context.new_path()
    context.move_to(0.5, 0.70)
    context.curve_to(0.49, 0.55, 0.52, 0.45, 0.5, 0.34)
    stroke(context, 0.035)
    colour(context, "6fb84c")
    leaf(context, 0.5, 0.54, 0.34, -0.55)
    colour(context, "4f9e3f")
    context.save()
    context.translate(1, 0)
    context.scale(-1, 1)
    leaf(context, 0.5, 0.46, 0.34, -0.75)
    context.restore()
    colour(context, "85cf5c")
    leaf(context, 0.5, 0.36, 0.22, -1.25)
    colour(context, "c26a3d")
    polygon(context, ((0.32, 0.70), (0.68, 0.70), (0.63, 0.89), (0.37, 0.89)))
    colour(context, "a8552d")
    rounded_bar(context, 0.29, 0.66, 0.42, 0.07, 0.02)


def wayfarer(context):
    backdrop(context, "fdfaf3", "e6dcc6")
    colour(context, "27374d")
    context.new_path()
    context.arc(0.5, 0.5, 0.36, 0, 2 * math.pi)
    stroke(context, 0.045)
    for quarter in range(12):
        angle = quarter * math.pi / 6
        inner = 0.27 if quarter % 3 == 0 else 0.295
        context.new_path()
        context.move_to(0.5 + inner * math.sin(angle), 0.5 - inner * math.cos(angle))
        context.line_to(0.5 + 0.315 * math.sin(angle), 0.5 - 0.315 * math.cos(angle))
        stroke(context, 0.018)
    context.save()
    context.translate(0.5, 0.5)
    context.rotate(0.6)
    colour(context, "e2453c")
    polygon(context, ((0, -0.27), (0.075, 0), (-0.075, 0)))
    colour(context, "9aa7b8")
    polygon(context, ((0, 0.27), (0.075, 0), (-0.075, 0)))
    context.restore()
    colour(context, "27374d")
    disc(context, 0.5, 0.5, 0.035)


def gambit(context):
    for row in range(4):
        for column in range(4):
            colour(context, "e9d9b8" if (row + column) % 2 == 0 else "9c7350")
            context.rectangle(column / 4, row / 4, 0.25, 0.25)
            context.fill()
    colour(context, "000000", 0.25)
    context.save()
    context.translate(0.5, 0.86)
    context.scale(1, 0.16)
    disc(context, 0, 0, 0.31)
    context.restore()
    colour(context, "1e1e26")
    disc(context, 0.5, 0.27, 0.135)
    rounded_bar(context, 0.35, 0.385, 0.30, 0.06, 0.03)
    context.new_path()
    context.move_to(0.42, 0.43)
    context.curve_to(0.44, 0.60, 0.38, 0.68, 0.31, 0.74)
    context.line_to(0.69, 0.74)
    context.curve_to(0.62, 0.68, 0.56, 0.60, 0.58, 0.43)
    context.close_path()
    context.fill()
    rounded_bar(context, 0.25, 0.735, 0.50, 0.115, 0.035)
    colour(context, "ffffff", 0.22)
    disc(context, 0.455, 0.225, 0.045)


DRAWINGS = {
    "Tides": tides, "Kettle": kettle, "Metronome": metronome, "Almanac": almanac,
    "Ledger": ledger, "Verdant": verdant, "Wayfarer": wayfarer, "Gambit": gambit,
}
WITH_ARTWORK = ("Tides", "Almanac", "Wayfarer")


def draw(drawing, size, path):
    surface = cairo.ImageSurface(cairo.FORMAT_RGB24, size, size)
    context = cairo.Context(surface)
    context.scale(size, size)
    drawing(context)
    path.parent.mkdir(parents=True, exist_ok=True)
    surface.write_to_png(str(path))


def main():
    for name, drawing in DRAWINGS.items():
        draw(drawing, ICON_SIZE, HERE / name / f"{name}.app" / "Icon.png")
        if name in WITH_ARTWORK:
            draw(drawing, ARTWORK_SIZE, HERE / name / "HarvoArtwork")


if __name__ == "__main__":
    main()
