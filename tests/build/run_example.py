#!/usr/bin/env python3
"""Runs the framed-photo example from end to end and measures its result with ImageMagick.

    run_example.py JOB BIN-DIR WORK-DIR -- [LAUNCHER...]
"""

import os
import pathlib
import shutil
import subprocess
import sys

# 2048x1024 shrinks to 1024x512 (the bounds are 1024x768), loses 8 at each side and gains a
# border of 16 at each side.
SAMPLE_SIZE = (2048, 1024)
RESULT_SIZE = (1024 - 2 * 8 + 2 * 16, 512 - 2 * 8 + 2 * 16)


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


def measure(path):
    """Format, width and height as another program sees them."""
    if shutil.which("identify") is None:
        fail("ImageMagick is missing; scripts/setup-linux.sh test installs it")
    done = subprocess.run(["identify", "-format", "%m %w %h", path], check=True,
                          capture_output=True, encoding="utf-8")
    return done.stdout.split()


def main(job, bin_dir, work_dir, dashes, *launcher):
    if dashes != "--":
        fail("the launcher follows --")
    work = pathlib.Path(work_dir)
    shutil.rmtree(work, ignore_errors=True)
    work.mkdir(parents=True)
    os.chdir(work)
    sample = work / "sample picture.jpg"
    result = work / "out" / "sample picture-framed.jpg"
    run = [*launcher, program(bin_dir, "make_sample"), sample.name, *map(str, SAMPLE_SIZE)]
    subprocess.run(run, check=True)
    run = [*launcher, program(bin_dir, "qvrun"), "run", "--verbose", "--output", "out", job,
           sample.name]
    subprocess.run(run, check=True)
    found = measure(on_this_machine(result, launcher))
    wanted = ["JPEG", *map(str, RESULT_SIZE)]
    if found != wanted:
        fail(f"{result} is {found}, not {wanted}")
    print("example job:", *found)


if __name__ == "__main__":
    main(*sys.argv[1:])
