#include "engine/bitmap/zmpixelformats.h"

#include <array>

#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::array<TZmPixelFormatRow, kPixelFormatCount> kFormats = {{
    {0, 0, "zmnull"},
    {1, 1, "zm1g"},
    {8, 1, "zm8p"},
    {8, 1, "zm8g"},
    {16, 1, "zm16g"},
    {24, 3, "zm24RGB"},
    {32, 1, "zm32f"},
    {32, 4, "zmCMYK"},
    {48, 3, "zm48RGB"},
    {24, 3, "zmCIELab"},
    {32, 4, "zm32RGB"},
}};

bool IsRowAlignment(std::int32_t bits) {
    return bits >= 8 && (bits & (bits - 1)) == 0;
}

}  // namespace

const TZmPixelFormatRow& PixelFormatInfo(TZmPixelFormat format) {
    return kFormats[format < kPixelFormatCount ? format : zmnull];
}

bool IsImageFormat(TZmPixelFormat format) {
    return format > zmnull && format < kPixelFormatCount;
}

std::optional<std::int64_t> CalcRowLen(std::int32_t width, std::int32_t bit_count,
                                       std::int32_t alignment_bits) {
    if (width < 0 || bit_count < 1 || bit_count > 64 || !IsRowAlignment(alignment_bits)) {
        return std::nullopt;
    }
    const std::int64_t alignment = alignment_bits;
    const std::int64_t bits = std::int64_t{width} * bit_count;
    const std::int64_t row_len = alignment / 8 * ((bits + alignment - 1) / alignment);
    if (row_len > kMaxInt32) {
        return std::nullopt;
    }
    return row_len;
}

}  // namespace zm
