#!/usr/bin/env python3
"""Runs an example job from end to end and measures its result with ImageMagick.

    run_example.py JOB BIN-DIR WORK-DIR -- [LAUNCHER...]
"""

import os
import pathlib
import shutil
import subprocess
import sys

# For each job: the size of the picture that it gets, the result's name, type and size, the
# variables that it asks for, and what a part of the result has to show: the darkest (minima) or
# lightest (maxima) value there, from 0 to 1, and its bounds.
EXAMPLES = {
    # 2048x1024 shrinks to 1024x512 (the bounds are 1024x768), loses 8 at each side and gains a
    # border of 16 at each side.
    "framed-photo": {
        "sample": (2048, 1024),
        "result": ("sample picture-framed.jpg", "JPEG", 1024 - 2 * 8 + 2 * 16,
                   512 - 2 * 8 + 2 * 16),
        "part": ("1040x10+0+0", "minima", 0.95, 1),
    },
    # White letters on the dark lake, as high as a line at the lower edge.
    "watermark": {
        "sample": (2400, 1600),
        "result": ("sample picture-web.jpg", "JPEG", 1200, 800),
        "variables": {"owner": "Photo: A. Example"},
        "part": ("300x40+450+760", "maxima", 0.9, 1),
    },
    # 320x213 grows by 1 at each side, 24 below, and 12, 12, 12, 4. The caption is dark grey.
    "contact-sheet-frame": {
        "sample": (960, 640),
        "result": ("sample picture-sheet.png", "PNG", 320 + 2 + 24, 213 + 2 + 24 + 16),
        "part": ("322x24+12+227", "minima", 0.2, 0.6),
    },
    # The badge's ring is white; its outermost point at the right lies 16 from the edge.
    "logo-overlay": {
        "sample": (2400, 1600),
        "result": ("sample picture-marked.jpg", "JPEG", 1200, 800),
        "variables": {"logo": "logo.png"},
        "part": ("4x20+1179+710", "minima", 0.75, 1),
    },
    "passport-crop": {
        "sample": (1200, 1600),
        "result": ("sample picture-passport.jpg", "JPEG", 413, 531),
    },
}


def fail(text):
    sys.exit("run_example.py: " + text)


def program(bin_dir, name):
    """Programs for Windows have an extension."""
    path = pathlib.Path(bin_dir, name)
    return str(path if path.exists() else path.with_suffix(".exe"))


def on_this_machine(path, launcher):
    """Where a written file is found: where mounts are forbidden it stays in the Wine folder."""
    if path.exists() or not launcher:
        return path
    setup = pathlib.Path(launcher[0]).with_name("setup-wine.sh")
    root = subprocess.run([setup, "--print-root"], check=True, capture_output=True,
                          encoding="utf-8").stdout.strip()
    return pathlib.Path(root + str(path))


def ask_imagemagick(*arguments):
    """What another program sees."""
    if shutil.which("identify") is None:
        fail("ImageMagick is missing; scripts/setup-linux.sh test installs it")
    done = subprocess.run([*map(str, arguments)], check=True, capture_output=True,
                          encoding="utf-8")
    return done.stdout.split()


def check_part(path, geometry, extreme, low, high):
    found = float(ask_imagemagick("convert", path, "-crop", geometry, "+repage", "-colorspace",
                                  "Gray", "-format", f"%[fx:{extreme}]", "info:")[0])
    if not low <= found <= high:
        fail(f"{extreme} of {geometry} in {path} is {found}, not {low} to {high}")


def main(job, bin_dir, work_dir, dashes, *launcher):
    if dashes != "--":
        fail("the launcher follows --")
    example = EXAMPLES[pathlib.Path(job).stem]
    work = pathlib.Path(work_dir)
    shutil.rmtree(work, ignore_errors=True)
    work.mkdir(parents=True)
    os.chdir(work)
    make_sample = [*launcher, program(bin_dir, "make_sample")]
    sample = "sample picture.jpg"
    subprocess.run([*make_sample, sample, *map(str, example["sample"])], check=True)
    subprocess.run([*make_sample, "--logo", "logo.png"], check=True)
    settings = [word for name, value in example.get("variables", {}).items()
                for word in ("--set", f"{name}={value}")]
    subprocess.run([*launcher, program(bin_dir, "qvrun"), "run", "--verbose", "--output", "out",
                    *settings, job, sample], check=True)
    name, *wanted = example["result"]
    result = on_this_machine(work / "out" / name, launcher)
    found = ask_imagemagick("identify", "-format", "%m %w %h", result)
    if found != [*map(str, wanted)]:
        fail(f"{result} is {found}, not {wanted}")
    if "part" in example:
        check_part(result, *example["part"])
    print("example job:", *found)


if __name__ == "__main__":
    main(*sys.argv[1:])
