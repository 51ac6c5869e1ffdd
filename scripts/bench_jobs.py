#!/usr/bin/env python3
"""Measures whole jobs with qvrun: CPU time and peak memory, the best of several runs.

    bench_jobs.py BIN-DIR WORK-DIR
"""

import os
import pathlib
import sys

RUNS = 9
LARGE_SIZE = (4000, 3000)
SMALL_SIZE = (64, 64)
OPEN = "[Open Image]\nimage_file={file}\n"
SAVE = "[Save Image]\nimage_file={out}/result.%s\nformat=%d\n"
RESIZE = "[Resize Image]\nimage_w=1024\nimage_h=768\n"
# Name, picture, its size, the job file's text.
JOBS = [
    ("64x64 PNG: open, save", "small.png", SMALL_SIZE, OPEN + SAVE % ("png", 1)),
    ("12 megapixels JPEG: open, save JPEG", "large.jpg", LARGE_SIZE, OPEN + SAVE % ("jpg", 0)),
    ("12 megapixels JPEG: open, resize, save JPEG", "large.jpg", LARGE_SIZE,
     OPEN + RESIZE + SAVE % ("jpg", 0)),
]


def run_measured(command):
    """CPU seconds and peak bytes of one run of a program that must succeed."""
    child = os.posix_spawn(command[0], command, os.environ)
    _, status, usage = os.wait4(child, 0)
    if status != 0:
        sys.exit(f"bench_jobs.py: {' '.join(command)} failed")
    return usage.ru_utime + usage.ru_stime, usage.ru_maxrss * 1024


def main(bin_dir, work_dir):
    work = pathlib.Path(work_dir)
    work.mkdir(parents=True, exist_ok=True)
    print(f"{'job':46}{'CPU':>12}{'peak memory':>14}   of the bitmap's size")
    for number, (name, picture, size, text) in enumerate(JOBS):
        picture_path = str(work / picture)
        run_measured([f"{bin_dir}/make_sample", picture_path, *map(str, size)])
        job = work / f"job{number}.qvjob"
        job.write_text(text, encoding="utf-8")
        command = [f"{bin_dir}/qvrun", "run", "--quiet", "--output", str(work), str(job),
                   picture_path]
        measures = [run_measured(command) for _ in range(RUNS)]
        seconds = min(measure[0] for measure in measures)
        peak = max(measure[1] for measure in measures)
        bitmap_bytes = size[0] * size[1] * 3
        print(f"{name:46}{seconds * 1000:9.1f} ms{peak / 2**20:10.1f} MiB   "
              f"{peak / bitmap_bytes:.2f}")


if __name__ == "__main__":
    main(*sys.argv[1:])
