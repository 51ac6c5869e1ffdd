#!/usr/bin/env python3
"""Crop, quarter turn and border jobs on 1-bit, palette and alpha pictures, checked pixel by pixel against what
ImageMagick reads from the source and from the result.

    pixels_job.py QVRUN WORK-DIR
"""

import pathlib
import shutil
import subprocess
import sys

CROP = (3, 2, -4, -1)  # left, top, right, bottom; negative counts from the far edge
BORDER = (5, 1, 2, 3)
RED = (255, 0, 0, 255)
WHITE = (255, 255, 255, 255)

JOB = f"""[Open Image]
image_file={{file}}
[Crop Image]
l={CROP[0]}
t={CROP[1]}
r={CROP[2]}
b={CROP[3]}
[Rotate Image]
angle=90
[Add Border to Image]
l={BORDER[0]}
t={BORDER[1]}
r={BORDER[2]}
b={BORDER[3]}
color=255
[Save Image]
image_file={{out}}/result-{{name}}.png
format=1
save_meta=%d
"""

# Name, ImageMagick's arguments for a picture of 37 by 23, the border's colour as stored: a 1-bit
# image knows black and white only, and every colour but black sets its bits.
SIZE = (37, 23)
SHAPES = ["-size", "37x23", "gradient:white-black", "-rotate", "0"]
COLOURS = ["-size", "37x23", "plasma:red-blue", "-seed", "7"]
PICTURES = (
    ("one-bit.bmp", [*SHAPES, "-threshold", "50%", "-monochrome", "BMP3:"], WHITE),
    ("one-bit.png", [*SHAPES, "-monochrome", "-define", "png:color-type=0", "-define",
                     "png:bit-depth=1", "PNG:"], WHITE),
    ("palette.bmp", [*COLOURS, "-colors", "16", "-type", "Palette", "BMP3:"], RED),
    ("palette.png", [*COLOURS, "-colors", "40", "PNG8:"], RED),
    ("alpha.png", [*COLOURS, "-channel", "A", "-fx", "i/w", "PNG32:"], RED),
    ("grey.png", [*SHAPES, "-define", "png:color-type=0", "-depth", "8", "PNG:"], RED),
)


def fail(text):
    sys.exit("pixels_job.py: " + text)


def magick(*arguments, data=None):
    """ImageMagick under the name that no other program shares."""
    return subprocess.run([MAGICK, *arguments], input=data,
                          check=True, capture_output=True).stdout


def find_magick():
    for name in ("convert-im6.q16", "convert-im6", "magick", "convert"):
        if shutil.which(name) is not None:
            return name
    return fail("ImageMagick is missing; scripts/setup-linux.sh test installs it")


MAGICK = find_magick()


def read_pixels(path, size):
    """Rows of (red, green, blue, alpha) as ImageMagick sees them."""
    raw = magick(str(path), "-depth", "8", "RGBA:-")
    if len(raw) != size[0] * size[1] * 4:
        fail(f"{path} has not {size[0]} by {size[1]} pixels")
    pixels = [tuple(raw[at:at + 4]) for at in range(0, len(raw), 4)]
    return [pixels[row * size[0]:(row + 1) * size[0]] for row in range(size[1])]


def expected(source, border_colour):
    """The crop, the turn and the border, worked out on the source's pixels."""
    left, top, right, bottom = CROP
    inner = [row[left:SIZE[0] + right] for row in source[top:SIZE[1] + bottom]]
    inner = [list(column) for column in zip(*reversed(inner))]  # clockwise
    width = len(inner[0]) + BORDER[0] + BORDER[2]
    rows = [[border_colour] * width for _ in range(BORDER[1])]
    rows += [[border_colour] * BORDER[0] + row + [border_colour] * BORDER[2] for row in inner]
    return rows + [[border_colour] * width for _ in range(BORDER[3])]


def same_pixel(found, wanted):
    """Colours of fully transparent pixels do not count."""
    return found == wanted or (found[3] == 0 and wanted[3] == 0)


def compare(name, found, wanted):
    for y, (found_row, wanted_row) in enumerate(zip(found, wanted, strict=True)):
        for x, (one, other) in enumerate(zip(found_row, wanted_row, strict=True)):
            if not same_pixel(one, other):
                fail(f"{name}: pixel {x}, {y} is {one}, not {other}")


def check(qvrun, work, job, picture):
    name, arguments, border_colour = picture
    source = work / name
    magick(*arguments[:-1], arguments[-1] + str(source))
    subprocess.run([qvrun, "run", job, source, "--quiet", "--output", work], check=True)
    wanted = expected(read_pixels(source, SIZE), border_colour)
    result = work / ("result-" + source.stem + ".png")
    compare(name, read_pixels(result, (len(wanted[0]), len(wanted))), wanted)


def main(qvrun, work_dir):
    work = pathlib.Path(work_dir)
    shutil.rmtree(work, ignore_errors=True)
    work.mkdir(parents=True)
    job = work / "job.qvjob"
    for save_meta in (0, 1):  # with 1 the file keeps the image's depth
        job.write_text(JOB % save_meta, encoding="utf-8")
        for picture in PICTURES:
            check(qvrun, work, job, picture)
    print(len(PICTURES), "kinds of pictures kept their pixels")


if __name__ == "__main__":
    main(*sys.argv[1:])
