#!/usr/bin/env python3
"""Runs one job of all eight actions with the program of this machine and with that for Windows.

    same_job.py NATIVE-BIN-DIR BIN-DIR WORK-DIR LAUNCHER...

Outside the text both pictures are the same, pixel by pixel; the text stands in the same place and
is as dark, and differs in its antialiasing only. Ends with 77 when there are no native programs.
"""

import os
import pathlib
import shutil
import subprocess
import sys

from run_example import ask_imagemagick, fail, on_this_machine, program

JOB = """\
[Open Image]
image_file={file}

[Resize Image]
image_w=240
image_h=240

[Crop Image]
l=5
t=3
r=-7
b=-2

[Rotate Image]
angle=17

[Rotate Image]
action=1

[Draw Image on Image]
image_file=logo.png
x_pos=2
y_pos=0
opacity=70

[Add Border to Image]
l=10
t=10
r=10
b=60
color=16777215

[Draw Text on Image]
text=Caption of a picture
font_name=DejaVu Sans
font_size=14
x_pos=1
y_pos=2

[Save Image]
image_file={out}/{name}.png
format=1
"""

# The border's lower part, where the caption stands.
CAPTION_HEIGHT = 50


def run(bin_dir, launcher, out):
    subprocess.run([*launcher, program(bin_dir, "qvrun"), "run", "--output", out, "job.qvjob",
                    "sample.jpg"], check=True)
    return on_this_machine(pathlib.Path(out, "sample.png").absolute(), launcher)


def caption_of(picture):
    """Left, top, right and bottom of the text, and the mean of its box, 0 black to 1 white."""
    words = ask_imagemagick("convert", picture, "-gravity", "South", "-crop",
                            f"x{CAPTION_HEIGHT}+0+0", "+repage", "-fuzz", "20%", "-trim", "-format",
                            "%w %h %X %Y %[fx:mean]", "info:")
    width, height, left, top = map(int, words[:4])
    return (left, top, left + width, top + height), float(words[4])


def differing_pixels(first, second):
    """Of the parts above the captions."""
    return float(ask_imagemagick("convert", first, second, "-gravity", "South", "-chop",
                                 f"0x{CAPTION_HEIGHT}", "-metric", "AE", "-compare", "-format",
                                 "%[distortion]", "info:")[0])


def main(native_dir, bin_dir, work_dir, *launcher):
    if not pathlib.Path(native_dir, "qvrun").exists():
        print("skipped: there is no native build beside this one")
        sys.exit(77)
    work = pathlib.Path(work_dir)
    shutil.rmtree(work, ignore_errors=True)
    work.mkdir(parents=True)
    os.chdir(work)
    make_sample = program(native_dir, "make_sample")
    subprocess.run([make_sample, "sample.jpg", "600", "400"], check=True)
    subprocess.run([make_sample, "--logo", "logo.png"], check=True)
    pathlib.Path("job.qvjob").write_text(JOB, encoding="utf-8")
    native = run(native_dir, (), "native")
    windows = run(bin_dir, launcher, "windows")
    differing = differing_pixels(native, windows)
    if differing != 0:
        fail(f"{differing:.0f} pixels differ outside the text: {native}, {windows}")
    (native_box, native_mean), (windows_box, windows_mean) = map(caption_of, (native, windows))
    if native_box[2] - native_box[0] < 100:
        fail(f"no caption in {native}")
    if any(abs(a - b) > 6 for a, b in zip(native_box, windows_box)):
        fail(f"the text stands at {native_box} and at {windows_box}")
    if abs(native_mean - windows_mean) > 0.08:
        fail(f"the text's box has the mean {native_mean} and {windows_mean}")
    print("the same on both:", native_box, windows_box, native_mean, windows_mean)


if __name__ == "__main__":
    main(*sys.argv[1:])
