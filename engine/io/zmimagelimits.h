#pragma once

#include <cstdint>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// The one limit for every image size that a file dictates, checked before any allocation: an
/// image may ask for at most kImageBytesFree plus kImageBytesPerFileByte times the bytes of its
/// file, both adjustable by an embedding program at start; width and height are at least 1 and a
/// row has at most 2^31 - 1 bytes. The ratio admits the densest honest compression (deflate
/// reaches about 1030 to 1).
struct TZmImageLimits {
    std::int64_t free_bytes = std::int64_t{512} << 20;
    std::int64_t bytes_per_file_byte = 1100;
};

/// The limits in force; written only during set-up.
TZmImageLimits& ZmImageLimits();

/// Whether an image of this size and depth may be allocated for a file of `file_bytes` bytes.
[[nodiscard]] bool ImageSizeIsAcceptable(std::int64_t width, std::int64_t height,
                                         std::int32_t bits_per_pixel, std::int64_t file_bytes);

}  // namespace zm
