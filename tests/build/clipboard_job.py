#!/usr/bin/env python3
"""Copies a picture in one qvrun process and pastes it in others, over the clipboard of an X
display of its own; another program reads what was copied, and offers what is pasted.

    clipboard_job.py QVRUN WORK-DIR [LAUNCHER...]

With a launcher, the way into Wine, the clipboard is the one of its session, which keeps what a
process that ended has put there. Ends with status 77 when Xvfb or xclip is missing.
"""

import os
import pathlib
import shutil
import subprocess
import sys
import time

from run_example import on_this_machine
from with_display import Display

SKIPPED = 77
PATIENCE = 100  # seconds for anything that has to happen
# Longer than a pipe holds: qvrun, which reports each missing file, stays alive until it is read.
MISSING_FILES = 3000
COPY = "[Open Image]\nimage_file={file}\n[Save Image]\ndest=1\n"
PASTE = "[Open Image]\nsource=1\n[Save Image]\nimage_file={out}/pasted.png\nformat=1\n"
# More than goes in one piece.
PICTURE = ["-size", "400x300", "plasma:red-blue", "-channel", "A", "-fx", "i/w", "PNG32:picture.png"]


def fail(text):
    sys.exit("clipboard_job.py: " + text)


def run(*command, **options):
    return subprocess.run(command, timeout=PATIENCE, capture_output=True, **options)


def pixels(name):
    """Every pixel with its alpha, as ImageMagick reads them."""
    done = run("convert", name, "-depth", "8", "RGBA:-")
    return done.stdout if done.returncode == 0 else None


def targets():
    done = run("xclip", "-selection", "clipboard", "-o", "-t", "TARGETS")
    return done.stdout.decode().splitlines()


def wait_for(condition, what):
    end = time.monotonic() + PATIENCE
    while not condition():
        if time.monotonic() > end:
            fail(what)
        time.sleep(0.05)


def paste(qvrun):
    pathlib.Path("pasted.png").unlink(missing_ok=True)
    return run(qvrun, "run", "paste.qvjob").stderr.decode()


def start_copy(qvrun):
    """A qvrun that has copied the picture and lives on."""
    names = ["picture.png"] + [f"missing-{i}.png" for i in range(MISSING_FILES)]
    pathlib.Path("names.txt").write_text("\n".join(names))
    copier = subprocess.Popen([qvrun, "run", "copy.qvjob", "--files-from", "names.txt", "--quiet"],
                              stderr=subprocess.PIPE)
    wait_for(lambda: "image/bmp" in targets(), "the copied picture does not appear")
    return copier


def check_copied(qvrun):
    offered = targets()
    for name in ("TARGETS", "TIMESTAMP", "MULTIPLE", "ZALMO RAW FORMAT", "image/bmp"):
        if name not in offered:
            fail(f"{name} is not among {offered}")
    if "image/png" in offered:
        fail("PNG is offered, which a job does not ask for")
    pathlib.Path("seen.bmp").write_bytes(
        run("xclip", "-selection", "clipboard", "-o", "-t", "image/bmp").stdout)
    run("convert", "picture.png", "-alpha", "off", "opaque.png")
    if pixels("seen.bmp") != pixels("opaque.png"):
        fail("another program sees other pixels")
    density = run("identify", "-format", "%x %U", "seen.bmp").stdout.decode()
    if not density.startswith("78.7"):  # 200 dots per inch
        fail("another program sees the resolution " + density)
    told = paste(qvrun)
    if pixels("pasted.png") != pixels("picture.png"):
        fail("pixels or alpha were lost on the way. " + told)


def check_foreign(qvrun):
    """What another program offers, in the two forms that programs use."""
    run("convert", "opaque.png", "BMP3:opaque.bmp")
    for name, target in (("picture.png", "image/png"), ("opaque.bmp", "image/bmp")):
        subprocess.run(["xclip", "-selection", "clipboard", "-t", target, "-i", name],
                       check=True, timeout=PATIENCE, stdout=subprocess.DEVNULL,
                       stderr=subprocess.DEVNULL)
        told = paste(qvrun)
        if pixels("pasted.png") != pixels(name):
            fail(f"{target} of another program comes out differently. {told}")
    subprocess.run(["xclip", "-selection", "clipboard", "-i", "names.txt"], check=True,
                   timeout=PATIENCE, stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
    if "code 4: Clipboard does not contain image data" not in paste(qvrun):
        fail("a text counts as an image")


def manager_python():
    """A Python that knows the X protocol; Debian's package is seen by the system's own only."""
    for python in (sys.executable, "/usr/bin/python3"):
        if run(python, "-c", "import Xlib").returncode == 0:
            return python
    return None


def check_hand_over(qvrun):
    """A process that ends gives its picture to a clipboard manager."""
    python = manager_python()
    if python is None:
        print("clipboard_job.py: no python3-xlib, the hand-over is not tried")
        return
    script = pathlib.Path(__file__).with_name("clipboard_manager.py")
    with subprocess.Popen([python, script], stdout=subprocess.PIPE, text=True) as manager:
        try:
            manager.stdout.readline()
            run(qvrun, "run", "copy.qvjob", "picture.png", check=True)
            told = paste(qvrun)
            if pixels("pasted.png") != pixels("picture.png"):
                fail("the clipboard manager did not get the picture. " + told)
        finally:
            manager.terminate()


class Session:
    """Wine ends its session, with the clipboard, a second after the last program in it; a command
    prompt that nobody types at keeps it. The session's own programs inherit what the first one
    has open: no pipe to wait for."""

    def __init__(self, launcher):
        self.prompt = subprocess.Popen([*launcher, r"C:\windows\system32\cmd.exe"],
                                       stdin=subprocess.PIPE, stdout=subprocess.DEVNULL,
                                       stderr=subprocess.DEVNULL)

    def __enter__(self):
        time.sleep(2)  # it starts
        return self

    def __exit__(self, *_):
        self.prompt.stdin.close()
        try:
            self.prompt.wait(timeout=PATIENCE)
        except subprocess.TimeoutExpired:
            self.prompt.kill()


def check_session(qvrun, launcher):
    """One process copies and ends, the next pastes."""
    with Session(launcher):
        for job, arguments in (("copy.qvjob", ["picture.png"]), ("paste.qvjob", [])):
            done = subprocess.run([*launcher, qvrun, "run", job, *arguments], timeout=240,
                                  capture_output=True)
            if done.returncode != 0:
                fail(f"{job} fails: {done.stderr.decode()}")
            # Nothing hastens the user who pastes.
            time.sleep(1.5)
    if pixels(on_this_machine(pathlib.Path("pasted.png").resolve(), launcher)) != pixels(
            "picture.png"):
        fail("pixels or alpha were lost on the way")


def main(qvrun, work_dir, *launcher):
    programs = ("convert",) if launcher else ("Xvfb", "xclip", "convert")
    missing = [name for name in programs if shutil.which(name) is None]
    if missing:
        print("clipboard_job.py: skipped, missing: " + " ".join(missing))
        sys.exit(SKIPPED)
    qvrun = str(pathlib.Path(qvrun).resolve())
    shutil.rmtree(work_dir, ignore_errors=True)
    pathlib.Path(work_dir).mkdir(parents=True)
    os.chdir(work_dir)
    pathlib.Path("copy.qvjob").write_text(COPY)
    pathlib.Path("paste.qvjob").write_text(PASTE)
    run("convert", *PICTURE, check=True)
    if launcher:
        check_session(qvrun, launcher)
        return
    with Display():
        copier = start_copy(qvrun)
        try:
            check_copied(qvrun)
            check_foreign(qvrun)
        finally:
            copier.communicate(timeout=PATIENCE)
        check_hand_over(qvrun)


if __name__ == "__main__":
    if len(sys.argv) < 3:
        fail("usage: clipboard_job.py QVRUN WORK-DIR [LAUNCHER...]")
    main(*sys.argv[1:])
