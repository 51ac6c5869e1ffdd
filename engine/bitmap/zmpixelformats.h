#pragma once

#include <cstdint>
#include <optional>

#include "engine/foundation/zmdefs.h"

/// The table of pixel formats and the size arithmetic of rows and images.
namespace zm {

struct TZmPixelFormatRow {
    std::int32_t bit_count;  ///< bits per pixel
    std::int32_t channel_count;
    const char* name;  ///< for messages and tests
};

/// Row of a format; ordinals above zm32RGB give the row of zmnull.
const TZmPixelFormatRow& PixelFormatInfo(TZmPixelFormat format);

/// Whether the ordinal names a format that can hold pixels.
bool IsImageFormat(TZmPixelFormat format);

/// Bytes per row: (A / 8) * ((width * bits + A - 1) / A), for an alignment of A bits (a power of
/// two from 8). Nothing when an argument is out of range or the result exceeds 32 signed bits.
std::optional<std::int64_t> CalcRowLen(std::int32_t width, std::int32_t bit_count,
                                       std::int32_t alignment_bits);

/// A set of pixel formats.
class TZmPixelFormatSet {
public:
    constexpr TZmPixelFormatSet() = default;
    template <typename... Formats>
    constexpr explicit TZmPixelFormatSet(Formats... formats)
        : bits_(((1u << formats) | ... | 0u)) {}
    constexpr bool Contains(TZmPixelFormat format) const { return (bits_ >> format & 1u) != 0; }
    constexpr bool IsEmpty() const { return bits_ == 0; }

private:
    std::uint32_t bits_ = 0;
};

}  // namespace zm
