#!/usr/bin/env python3
"""What other libraries take for the work of bitmap_bench.cpp: best of several runs in one thread,
CPU time of this process, beside a memcpy of the same bytes in the same run.

    peers.py        libraries that are not installed are left out (python3-opencv, python3-pil)

Only the ratios to the memcpy mean something on another machine. Results are written into pictures
that exist already wherever a library can do that; where it cannot, its allocation counts.
"""

import ctypes
import time

WIDTH = 4000
HEIGHT = 3000
PICTURE_BYTES = WIDTH * HEIGHT * 3
RUNS = 15


def best_milliseconds(work):
    best = float("inf")
    for _ in range(RUNS):
        start = time.process_time_ns()
        work()
        best = min(best, time.process_time_ns() - start)
    return best / 1e6


def memcpy_work():
    source = ctypes.create_string_buffer(b"\1" * PICTURE_BYTES, PICTURE_BYTES)
    dest = ctypes.create_string_buffer(b"\2" * PICTURE_BYTES, PICTURE_BYTES)
    return lambda: ctypes.memmove(dest, source, PICTURE_BYTES)


def opencv_works():
    import cv2
    import numpy

    cv2.setNumThreads(1)
    random = numpy.random.default_rng(1)

    def picture(channels, kind=numpy.uint8):
        shape = (HEIGHT, WIDTH, channels) if channels > 1 else (HEIGHT, WIDTH)
        return random.integers(0, 256, shape, dtype=numpy.uint8).astype(kind)

    rgb, other, gray, bgra = picture(3), picture(3), picture(1), picture(4)
    words = picture(3, numpy.uint16)
    to_gray, to_rgb, to_bgra = gray.copy(), rgb.copy(), bgra.copy()
    to_words = words.copy()
    return {
        "zm24RGB to zm8g": lambda: cv2.cvtColor(rgb, cv2.COLOR_BGR2GRAY, dst=to_gray),
        "zm24RGB to zm32RGB": lambda: cv2.cvtColor(rgb, cv2.COLOR_BGR2BGRA, dst=to_bgra),
        "zm32RGB to zm24RGB": lambda: cv2.cvtColor(bgra, cv2.COLOR_BGRA2BGR, dst=to_rgb),
        "zm24RGB to zm48RGB": lambda: cv2.multiply(rgb, (257.0, 257.0, 257.0, 0.0), dst=to_words,
                                                   dtype=cv2.CV_16U),
        "zm48RGB to zm24RGB": lambda: cv2.convertScaleAbs(words, dst=to_rgb, alpha=1 / 257),
        "zm8g to zm24RGB": lambda: cv2.cvtColor(gray, cv2.COLOR_GRAY2BGR, dst=to_rgb),
        "Crop, growing": lambda: cv2.copyMakeBorder(rgb, 50, 50, 50, 50, cv2.BORDER_CONSTANT,
                                                    value=(255, 255, 255)),
        "two pictures blended": lambda: cv2.addWeighted(rgb, 0.8, other, 0.2, 0, dst=to_rgb),
        "Fill": lambda: cv2.rectangle(to_rgb, (0, 0), (WIDTH - 1, HEIGHT - 1), (32, 64, 128), -1),
        "CopyRectTo": lambda: numpy.copyto(to_rgb, rgb),
    }


def pillow_works():
    from PIL import Image, ImageOps

    noise = Image.effect_noise((WIDTH, HEIGHT), 64)
    rgb = Image.merge("RGB", (noise, noise.rotate(180), noise))
    rgba = rgb.convert("RGBA")
    indexed = noise.copy()
    indexed.putpalette([i * 7 % 256 for i in range(768)])
    bits = noise.convert("1")
    other = rgb.rotate(180)
    return {
        "zm24RGB to zm8g": lambda: rgb.convert("L"),
        "zm24RGB to zm32RGB": lambda: rgb.convert("RGBA"),
        "zm32RGB to zm24RGB": lambda: rgba.convert("RGB"),
        "zm8g to zm24RGB": lambda: noise.convert("RGB"),
        "zm8p to zm24RGB": lambda: indexed.convert("RGB"),
        "zm1g to zm24RGB": lambda: bits.convert("RGB"),
        "zm24RGB to zm1g": lambda: rgb.convert("1"),
        "Crop, growing": lambda: ImageOps.expand(rgb, 50, (255, 255, 255)),
        "two pictures blended": lambda: Image.blend(other, rgb, 0.8),
        "Fill": lambda: rgb.paste((128, 64, 32), (0, 0, WIDTH, HEIGHT)),
        "CopyRectTo": lambda: other.paste(rgb, (0, 0)),
    }


def main():
    copy = best_milliseconds(memcpy_work())
    print(f"{'memcpy of the picture':42}{copy:9.2f} ms{1:9.2f}")
    for name, make_works in (("OpenCV", opencv_works), ("Pillow", pillow_works)):
        try:
            works = make_works()
        except ImportError:
            print(f"{name}: not installed")
            continue
        for work_name, work in works.items():
            spent = best_milliseconds(work)
            print(f"{name + ': ' + work_name:42}{spent:9.2f} ms{spent / copy:9.2f}")


if __name__ == "__main__":
    main()
