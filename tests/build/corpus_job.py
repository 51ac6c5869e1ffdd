#!/usr/bin/env python3
"""Runs a whole job over every sample BMP, PNG and JPEG file and measures the results with
ImageMagick.

    corpus_job.py QVRUN CORPUS-DIR WORK-DIR

Without the folder of sample files the test says so and is skipped (status 77).
"""

import os
import pathlib
import shutil
import subprocess
import sys

SKIPPED = 77
FORMATS = ("bmp", "png", "jpeg")

# 48 by 64 after the quarter turn; the free angle adds to both sides, how much depends on the
# pixel format; the crop takes 44 by 60 of it, and the border adds 3 at each side.
JOB = """[Open Image]
image_file={file}
[Resize Image]
image_w=64
image_h=48
keep_aspect_ratio=0
[Rotate Image]
angle=90
[Rotate Image]
angle=-7
[Crop Image]
l=4
t=4
r=48
b=64
[Add Border to Image]
l=3
t=3
r=3
b=3
color=255
[Save Image]
image_file={out}/{index}.%s
format=%d
"""
RESULT_SIZE = "50 66"
SAVED_AS = (("jpg", 0, "JPEG"), ("png", 1, "PNG"), ("bmp", 3, "BMP"))


def fail(text):
    sys.exit("corpus_job.py: " + text)


def holds_no_rows(path):
    """A JPEG file that ends with its last header, before any picture data."""
    data = path.read_bytes()
    at = 2
    while data[:2] == b"\xff\xd8" and at + 4 <= len(data) and data[at] == 0xFF:
        at_scan = data[at + 1] == 0xDA
        at += 2 + int.from_bytes(data[at + 2:at + 4], "big")
        if at_scan:
            return at + 2 >= len(data)
    return False


def sample_files(corpus):
    paths = [path for name in FORMATS for path in sorted((corpus / name).iterdir())]
    return [path for path in paths if not holds_no_rows(path)]


def run_job(qvrun, work, files, extension, number):
    job = work / f"job-{extension}.qvjob"
    job.write_text(JOB % (extension, number), encoding="utf-8")
    command = [qvrun, "run", job, "-", "--null", "--jobs", "2", "--quiet", "--output", work]
    names = b"\0".join(os.fsencode(path) for path in files)
    done = subprocess.run(command, input=names, capture_output=True, check=False)
    if done.returncode != 0:
        fail(f"status {done.returncode}:\n" + done.stderr.decode("utf-8", "replace"))


def measure(work, count, extension, magick_name):
    """Every result as another program sees it."""
    names = [str(work / f"{index}.{extension}") for index in range(1, count + 1)]
    done = subprocess.run(["identify", "-format", "%m %w %h\n", *names], check=True,
                          capture_output=True, encoding="utf-8")
    for name, found in zip(names, done.stdout.splitlines(), strict=True):
        # ImageMagick names a BMP after its header's version.
        if not found.startswith(magick_name) or not found.endswith(" " + RESULT_SIZE):
            fail(f"{name} is {found}, not {magick_name} {RESULT_SIZE}")


def main(qvrun, corpus_dir, work_dir):
    corpus = pathlib.Path(os.environ.get("ZM_CORPUS", corpus_dir))
    if not corpus.is_dir():
        print("skipped: the folder of sample files is not there")
        sys.exit(SKIPPED)
    if shutil.which("identify") is None:
        fail("ImageMagick is missing; scripts/setup-linux.sh test installs it")
    work = pathlib.Path(work_dir)
    shutil.rmtree(work, ignore_errors=True)
    work.mkdir(parents=True)
    files = sample_files(corpus)
    for extension, number, magick_name in SAVED_AS:
        run_job(qvrun, work, files, extension, number)
        measure(work, len(files), extension, magick_name)
    print(len(files), "sample files went through the job as", len(SAVED_AS), "formats")


if __name__ == "__main__":
    main(*sys.argv[1:])
