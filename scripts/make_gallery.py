#!/usr/bin/env python3
"""Makes the pictures of docs/gallery: what each action does to one picture that make_sample draws.

    make_gallery.py BIN-DIR [OUTPUT-DIR]
"""

import pathlib
import subprocess
import sys
import tempfile

SAMPLE_SIZE = (480, 320)
LARGEST_BYTES = 40000  # of one picture
ROW_HEIGHT = 44
ROW_MARGIN = 8

OPEN = "[Open Image]\nimage_file={file}\n"
WHITE = 0xFFFFFF


def step(name, /, **keys):
    return f"[{name}]\n" + "".join(f"{key}={value}\n" for key, value in keys.items())


def text(line, **keys):
    defaults = {"font_name": "DejaVu Sans", "font_color": WHITE}
    return step("Draw Text on Image", text=line, **{**defaults, **keys})


def lines(*rows):
    """Rows of (text, keys) below each other on white: all that a crop beside the picture finds."""
    ground = step("Crop Image", l=SAMPLE_SIZE[0], t=0, r=2 * SAMPLE_SIZE[0],
                  b=2 * ROW_MARGIN + ROW_HEIGHT * len(rows))
    return ground + "".join(
        text(line, **{"custom_x": ROW_MARGIN, "custom_y": ROW_MARGIN + ROW_HEIGHT * number,
                      "font_size": 20, "font_color": 0, **keys})
        for number, (line, keys) in enumerate(rows))


# Name of the picture, steps between opening and saving.
PICTURES = {
    "open.jpg": "",
    "save.png": step("Resize Image", image_w=160, image_h=160),
    "resize.jpg": step("Resize Image", image_w=50, units_w=1, image_h=50, units_h=1),
    "crop.jpg": step("Crop Image", l=55, ul=1, t=15, ut=1, r=90, ur=1, b=75, ub=1),
    "rotate.jpg": step("Rotate Image", angle=12),
    "flip.jpg": step("Rotate Image", action=1),
    "text.jpg": text("Evening at the lake", font_size=26, font_styles=1, x_pos=1, y_pos=2) +
                text("12 of 36", font_size=11, x_pos=2, y_pos=0),
    "text-styles.png": lines(
        ("Regular, bold, italic: 16 pt", {"font_size": 16}),
        ("Bold", {"font_styles": 1}),
        ("Italic jf", {"font_styles": 2}),
        ("Underlined gjpqy", {"font_styles": 4}),
        ("Struck out", {"font_styles": 8}),
        ("Bold, italic, underlined", {"font_styles": 7, "font_color": 0xA04010})),
    "text-scripts.png": lines(
        ("Voilà, Ångström, cœur, żółć", {}),
        ("Ελληνικά, Русский, Հայերեն", {}),
        ("שלום עולם, مرحبا", {}),
        ("a\u0301 e\u0308 o\u0302\u0301 n\u0303, ½ + ⅓ ≠ ∞", {}),
        ("\U0001F600 ✔ ♥ → ★ \U0001F4F7", {})),
    "image.jpg": step("Draw Image on Image", image_file="{logo}", x_pos=2, y_pos=2) +
                 step("Draw Image on Image", image_file="{logo}", x_pos=0, y_pos=0, opacity=50),
    "border.jpg": step("Add Border to Image", l=4, t=4, r=4, b=4, color=0x303030) +
                  step("Add Border to Image", l=16, t=16, r=16, b=16, color=WHITE),
}


def run(bin_dir, name, *arguments):
    subprocess.run([str(pathlib.Path(bin_dir, name).resolve()), *map(str, arguments)], check=True)


def make_picture(bin_dir, work, target, steps):
    job = work / (target.name + ".qvjob")
    save = step("Save Image", image_file="{target}", format=0 if target.suffix == ".jpg" else 1)
    job.write_text("\n".join([OPEN, steps, save]), encoding="utf-8")
    run(bin_dir, "qvrun", "run", "--quiet", "--set", f"target={target}", "--set",
        f"logo={work / 'logo.png'}", job, work / "sample.bmp")
    size = target.stat().st_size
    if size > LARGEST_BYTES:
        sys.exit(f"make_gallery.py: {target} takes {size} bytes")
    print(f"{target.name}: {size} bytes")


def main(bin_dir, output="docs/gallery"):
    output = pathlib.Path(output).resolve()
    output.mkdir(parents=True, exist_ok=True)
    with tempfile.TemporaryDirectory() as folder:
        work = pathlib.Path(folder)
        run(bin_dir, "make_sample", work / "sample.bmp", *SAMPLE_SIZE)
        run(bin_dir, "make_sample", "--logo", work / "logo.png")
        for name, steps in PICTURES.items():
            make_picture(bin_dir, work, output / name, steps)


if __name__ == "__main__":
    main(*sys.argv[1:])
