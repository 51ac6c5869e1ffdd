#!/usr/bin/env python3
"""What other libraries take for the work of zmbench, and a table of both.

    peers.py ZMBENCH-JSON    (what zmbench wrote with --benchmark_out and the format json)

Best of several runs in one thread, CPU time of this process, beside a memcpy of the same picture
in the same run: only the ratios to that mean something on another machine. Results are written
into pictures that exist already wherever a library can do that; where it cannot, its allocation
counts. Libraries that are not installed are left out: python3-opencv, python3-pil, libvips.
"""

import ctypes
import ctypes.util
import json
import re
import sys
import time

import peers_processing

WIDTH = 4000
HEIGHT = 3000
OVERLAY = 2000
PICTURE_BYTES = WIDTH * HEIGHT * 3
RUNS = 9


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


# Each of the following gives works by the names that zmbench has for them.


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
        "Convert/zm24RGB_to_zm8g": lambda: cv2.cvtColor(rgb, cv2.COLOR_BGR2GRAY, dst=to_gray),
        "Convert/zm24RGB_to_zm32RGB": lambda: cv2.cvtColor(rgb, cv2.COLOR_BGR2BGRA, dst=to_bgra),
        "Convert/zm32RGB_to_zm24RGB": lambda: cv2.cvtColor(bgra, cv2.COLOR_BGRA2BGR, dst=to_rgb),
        "Convert/zm24RGB_to_zm48RGB": lambda: cv2.multiply(rgb, (257.0, 257.0, 257.0, 0.0),
                                                           dst=to_words, dtype=cv2.CV_16U),
        "Convert/zm48RGB_to_zm24RGB": lambda: cv2.convertScaleAbs(words, dst=to_rgb,
                                                                  alpha=1 / 257),
        "Convert/zm8g_to_zm24RGB": lambda: cv2.cvtColor(gray, cv2.COLOR_GRAY2BGR, dst=to_rgb),
        "CropGrowing": lambda: cv2.copyMakeBorder(rgb, 50, 50, 50, 50, cv2.BORDER_CONSTANT,
                                                  value=(255, 255, 255)),
        "Fill": lambda: cv2.rectangle(to_rgb, (0, 0), (WIDTH - 1, HEIGHT - 1), (32, 64, 128), -1),
        "CopyRectTo": lambda: numpy.copyto(to_rgb, rgb),
        "RenderWhole/copy": lambda: numpy.copyto(to_rgb, rgb),
        "RenderWhole/opacity": lambda: cv2.addWeighted(rgb, 0.8, other, 0.2, 0, dst=to_rgb),
        "RenderWhole/plane_and_opacity": lambda: cv2.addWeighted(rgb, 0.8, other, 0.2, 0,
                                                                 dst=to_rgb),
        "RenderOperation/zmlMul": lambda: cv2.multiply(rgb, other, dst=to_rgb, scale=1 / 256),
        "RenderOperation/zmlAdd": lambda: cv2.add(rgb, other, dst=to_rgb),
        "RenderOperation/zmlSub": lambda: cv2.absdiff(rgb, other, dst=to_rgb),
        "RenderOperation/zmlMAX": lambda: cv2.max(rgb, other, dst=to_rgb),
        "RenderOperation/zmlMIN": lambda: cv2.min(rgb, other, dst=to_rgb),
        "RenderOperation/zmlAverage": lambda: cv2.addWeighted(rgb, 0.5, other, 0.5, 0,
                                                              dst=to_rgb),
    }


def pillow_works():
    from PIL import Image, ImageChops, ImageOps

    noise = Image.effect_noise((WIDTH, HEIGHT), 64)
    rgb = Image.merge("RGB", (noise, noise.rotate(180), noise))
    rgba = rgb.convert("RGBA")
    indexed = noise.copy()
    indexed.putpalette([i * 7 % 256 for i in range(768)])
    bits = noise.convert("1")
    other = rgb.rotate(180)
    small = rgb.crop((0, 0, OVERLAY, OVERLAY))
    small_mask = noise.crop((0, 0, OVERLAY, OVERLAY))
    works = {
        "Convert/zm24RGB_to_zm8g": lambda: rgb.convert("L"),
        "Convert/zm24RGB_to_zm32RGB": lambda: rgb.convert("RGBA"),
        "Convert/zm32RGB_to_zm24RGB": lambda: rgba.convert("RGB"),
        "Convert/zm8g_to_zm24RGB": lambda: noise.convert("RGB"),
        "Convert/zm8p_to_zm24RGB": lambda: indexed.convert("RGB"),
        "Convert/zm1g_to_zm24RGB": lambda: bits.convert("RGB"),
        "Convert/zm24RGB_to_zm1g": lambda: rgb.convert("1"),  # diffuses its errors
        "CropGrowing": lambda: ImageOps.expand(rgb, 50, (255, 255, 255)),
        "Fill": lambda: rgb.paste((128, 64, 32), (0, 0, WIDTH, HEIGHT)),
        "CopyRectTo": lambda: other.paste(rgb, (0, 0)),
        "RenderWhole/opacity": lambda: Image.blend(other, rgb, 0.8),
        "RenderWhole/plane": lambda: other.paste(rgb, (0, 0), noise),
        "RenderWhole/plane_and_opacity": lambda: other.paste(rgb, (0, 0), noise),
        "RenderOverlay": lambda: other.paste(small, (0, 0), small_mask),
        "RenderOperation/zmlAverage": lambda: Image.blend(other, rgb, 0.5),
    }
    operations = {"zmlMul": "multiply", "zmlScreen": "screen", "zmlOverlay": "overlay",
                  "zmlHardLight": "hard_light", "zmlSoftLight": "soft_light", "zmlAdd": "add",
                  "zmlSub": "difference", "zmlMAX": "lighter", "zmlMIN": "darker"}
    for name, function in operations.items():
        blend = getattr(ImageChops, function)
        works["RenderOperation/" + name] = lambda blend=blend: blend(rgb, other)
    return works


def vips_works():
    """Through the library's own interface; a work ends with the whole result in memory."""
    name = ctypes.util.find_library("vips")
    if name is None:
        raise ImportError
    vips = ctypes.CDLL(name)
    vips.vips_image_new_from_memory_copy.restype = ctypes.c_void_p
    vips.vips_image_write_to_memory.restype = ctypes.c_void_p
    if vips.vips_init(b"peers") != 0:
        raise ImportError
    vips.vips_concurrency_set(1)
    vips.vips_cache_set_max(0)
    standard_colors, modes = 22, {"Overlay": 2, "Operation/zmlExclusion": 24,
                                  "Operation/zmlSoftLight": 22, "Operation/zmlScreen": 15}

    def picture(width, height, channels):
        count = width * height * channels
        pixels = bytes(i * 7 % 251 for i in range(1004)) * (count // 1004 + 1)
        raw = vips.vips_image_new_from_memory_copy(pixels, ctypes.c_size_t(count), width, height,
                                                   channels, 0)
        image = ctypes.c_void_p()
        vips.vips_copy(ctypes.c_void_p(raw), ctypes.byref(image), b"interpretation",
                       standard_colors, None)
        return image

    def composite(base, overlay, mode):
        result, size = ctypes.c_void_p(), ctypes.c_size_t()
        if vips.vips_composite2(base, overlay, ctypes.byref(result), mode, None) != 0:
            raise RuntimeError("libvips")
        pixels = vips.vips_image_write_to_memory(result, ctypes.byref(size))
        vips.g_free(ctypes.c_void_p(pixels))
        vips.g_object_unref(result)

    base, other, small = (picture(WIDTH, HEIGHT, 3), picture(WIDTH, HEIGHT, 3),
                          picture(OVERLAY, OVERLAY, 4))
    return {"Render" + work: lambda over=small if work == "Overlay" else other, mode=mode:
            composite(base, over, mode) for work, mode in modes.items()}


def measure_peers():
    """Best time and its library of each work, in memcpys of the picture of this run."""
    copy = best_milliseconds(memcpy_work())
    best = {}
    for library, make_works in (("OpenCV", opencv_works), ("Pillow", pillow_works),
                                ("libvips", vips_works),
                                ("OpenCV", peers_processing.opencv_works),
                                ("Pillow", peers_processing.pillow_works)):
        try:
            works = make_works()
        except ImportError:
            print(f"{library}: not installed, left out")
            continue
        for name, work in works.items():
            spent = best_milliseconds(work) / copy
            best[name] = min(best.get(name, (spent, library)), (spent, library))
    return best


def engine_times(path):
    """CPU milliseconds by name, the best of repetitions."""
    times = {}
    with open(path, encoding="utf-8") as file:
        for run in json.load(file)["benchmarks"]:
            if run.get("run_type") == "iteration":
                scale = {"ns": 1e-6, "us": 1e-3, "ms": 1.0, "s": 1e3}[run["time_unit"]]
                name = run["name"].split("/repeats:")[0]
                # With several threads only the time that passes says how long the work took.
                spent = run["real_time" if name.endswith("/real_time") else "cpu_time"] * scale
                times[name] = min(times.get(name, float("inf")), spent)
    return times


def share_of_memcpy(name, memcpys):
    """The speed of a conversion, in bytes read and written, as a part of memcpy's."""
    bits = {"zm1g": 1, "zm8g": 8, "zm8p": 8, "zm24RGB": 24, "zm32RGB": 32, "zm48RGB": 48}
    pair = re.fullmatch(r"Convert/(\w+)_to_(\w+)", name)
    return f"{(bits[pair[1]] + bits[pair[2]]) / 48 / memcpys:.0%}" if pair else ""


def main(path):
    times = engine_times(path)
    if "Memcpy" not in times:
        print("peers.py: no memcpy in this run of zmbench, so nothing to compare")
        return
    peers = measure_peers()
    print(f"{'work':34}{'ms':>8}{'memcpys':>9}{'of memcpy':>11}{'best peer':>17}{'to peer':>9}")
    for name, spent in times.items():
        if not re.match("Memcpy|Fill|CopyRect|Crop|Convert|Raw|Render|Resample|Lanczos3/|Rotate/|"
                        "Flip|Quant", name):
            continue
        memcpys = spent / times["Memcpy"]
        peer, ratio = "", ""
        if name in peers:
            peer = f"{peers[name][0]:.2f} {peers[name][1]}"
            ratio = f"{memcpys / peers[name][0]:.2f}"
        print(f"{name:34}{spent:8.2f}{memcpys:9.2f}{share_of_memcpy(name, memcpys):>11}"
              f"{peer:>17}{ratio:>9}")


if __name__ == "__main__":
    main(sys.argv[1])
