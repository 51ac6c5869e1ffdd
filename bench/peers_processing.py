"""Resizing, rotation and colour reduction by other libraries, for peers.py: the works by the names
that zmbench has for them, in one thread."""

import io

WIDTH = 4000
HEIGHT = 3000
SMALL = (1000, 750)
UNEVEN = (1024, 768)
WHITE = (255, 255, 255)


def opencv_works():
    import cv2
    import numpy

    cv2.setNumThreads(1)
    random = numpy.random.default_rng(1)
    large = random.integers(0, 256, (HEIGHT, WIDTH, 3), dtype=numpy.uint8)
    small = numpy.ascontiguousarray(large[:SMALL[1], :SMALL[0]])
    to_large, to_small = large.copy(), small.copy()
    to_turned = numpy.empty((WIDTH, HEIGHT, 3), numpy.uint8)

    def resize(source, size, method, target=None):
        return lambda: cv2.resize(source, size, dst=target, interpolation=method)

    def rotate(angle, method):
        # The whole turned picture on a canvas that holds it, as the engine does.
        matrix = cv2.getRotationMatrix2D((WIDTH / 2, HEIGHT / 2), angle, 1)
        width = int(HEIGHT * abs(matrix[0, 1]) + WIDTH * abs(matrix[0, 0]))
        height = int(HEIGHT * abs(matrix[0, 0]) + WIDTH * abs(matrix[0, 1]))
        matrix[0, 2] += (width - WIDTH) / 2
        matrix[1, 2] += (height - HEIGHT) / 2
        target = numpy.empty((height, width, 3), numpy.uint8)
        return lambda: cv2.warpAffine(large, matrix, (width, height), dst=target, flags=method,
                                      borderMode=cv2.BORDER_CONSTANT, borderValue=WHITE)

    return {
        "Resample/BilinearShrink": resize(large, SMALL, cv2.INTER_AREA, to_small),
        "Resample/BilinearShrink1024": resize(large, UNEVEN, cv2.INTER_AREA),
        "Resample/BilinearEnlarge": resize(small, (WIDTH, HEIGHT), cv2.INTER_LINEAR, to_large),
        "Resample/BicubicEnlarge": resize(small, (WIDTH, HEIGHT), cv2.INTER_CUBIC, to_large),
        "Rotate/Bilinear7": rotate(7, cv2.INTER_LINEAR),
        "Rotate/Left90": lambda: cv2.rotate(large, cv2.ROTATE_90_COUNTERCLOCKWISE,
                                            dst=to_turned),
        "Flip/Horizontal": lambda: cv2.flip(large, 1, dst=to_large),
        "Flip/Vertical": lambda: cv2.flip(large, 0, dst=to_large),
    }


def camera_picture():
    """The picture of zmbench: smooth shapes under some noise. What finding colours takes depends
    on how many there are."""
    import numpy
    from PIL import Image

    across = (numpy.arange(WIDTH * 3, dtype=numpy.int32) * 255 // (WIDTH * 3)).astype(numpy.uint8)
    down = (numpy.arange(HEIGHT) // 8).astype(numpy.uint8)[:, None]
    noise = numpy.random.default_rng(1).integers(0, 16, (HEIGHT, WIDTH * 3), dtype=numpy.uint8)
    return Image.fromarray((across + down + noise).reshape(HEIGHT, WIDTH, 3))


def colour_reduction():
    from PIL import Image

    file = io.BytesIO()
    camera_picture().save(file, "BMP")

    def reduce_colours():
        file.seek(0)
        Image.open(file).quantize(256, method=Image.Quantize.FASTOCTREE, dither=0)

    return reduce_colours


def pillow_works():
    from PIL import Image

    noise = Image.effect_noise((WIDTH, HEIGHT), 64)
    large = Image.merge("RGB", (noise, noise.rotate(180), noise))
    small = large.crop((0, 0, *SMALL))
    lanczos = lambda: large.resize(SMALL, Image.Resampling.LANCZOS)
    works = {
        "Resample/BilinearShrink": lambda: large.reduce(4),
        "Resample/BilinearShrink1024": lambda: large.resize(UNEVEN, Image.Resampling.BOX),
        "Resample/BilinearEnlarge": lambda: small.resize((WIDTH, HEIGHT),
                                                         Image.Resampling.BILINEAR),
        "Resample/BicubicEnlarge": lambda: small.resize((WIDTH, HEIGHT),
                                                        Image.Resampling.BICUBIC),
        "Lanczos3/threads:1/real_time": lanczos,
        "Lanczos3/threads:2/real_time": lanczos,
        "Rotate/Left90": lambda: large.transpose(Image.Transpose.ROTATE_90),
        "Flip/Horizontal": lambda: large.transpose(Image.Transpose.FLIP_LEFT_RIGHT),
        "Flip/Vertical": lambda: large.transpose(Image.Transpose.FLIP_TOP_BOTTOM),
    }
    try:
        works["QuantizeFile"] = colour_reduction()
    except ImportError:
        pass  # the picture needs python3-numpy
    return works
