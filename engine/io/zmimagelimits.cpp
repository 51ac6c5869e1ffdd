#include "engine/io/zmimagelimits.h"

#include <limits>

#include "engine/foundation/zmnumbers.h"

namespace zm {

namespace {

/// Bytes that a file of this size may ask for, saturated.
std::int64_t AllowedBytes(const TZmImageLimits& limits, std::int64_t file_bytes) {
    const std::int64_t known_bytes = file_bytes < 0 ? 0 : file_bytes;
    const auto by_file = CheckedMul(limits.bytes_per_file_byte, known_bytes);
    constexpr std::int64_t kMost = std::numeric_limits<std::int64_t>::max();
    if (!by_file || *by_file > kMost - limits.free_bytes) {
        return kMost;
    }
    return limits.free_bytes + *by_file;
}

}  // namespace

TZmImageLimits& ZmImageLimits() {
    static TZmImageLimits limits;
    return limits;
}

bool ImageSizeIsAcceptable(std::int64_t width, std::int64_t height, std::int32_t bits_per_pixel,
                           std::int64_t file_bytes) {
    if (width < 1 || height < 1 || width > kMaxInt32 || height > kMaxInt32 || bits_per_pixel < 1) {
        return false;
    }
    const std::int64_t row_bytes = (width * bits_per_pixel + 7) / 8;
    if (row_bytes > kMaxInt32) {
        return false;
    }
    const std::int64_t image_bytes = row_bytes * height;
    return FitsAddressSpace(image_bytes) &&
           image_bytes <= AllowedBytes(ZmImageLimits(), file_bytes);
}

}  // namespace zm
