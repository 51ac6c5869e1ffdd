#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// Device-independent bitmaps in memory: an info header, channel masks or a colour table, and rows
/// of whole 32-bit words, bottom row first unless the height is negative. Packed means: all of it
/// in one block. The form of the system's clipboard and of its drawing calls. Members of TZmBitmap:
///
/// CopyFromDIB: takes a packed one, or one in two parts. Black and white becomes zm1g, a grey ramp
/// zm8g, all else zm24RGB, channels of less than 8 bits stretched over 8; an alpha mask in the
/// header gives a plane, unless all of it is 0 or 255. False, and the bitmap as it was, for what
/// ParseDibInfo refuses, rows that are not all there, and virtual bitmaps. The last row may lack
/// its padding.
///
/// CreateDIB: the image, or a rectangle of it (x2, y2 included), as a packed one: 1 bit for zm1g, 8
/// for zm8p and greys, 24 for all others; the alpha plane is left out. Empty for an empty image, a
/// rectangle outside it, and beyond 2^31 - 1 bytes. Resolutions in dots per inch, 0 for none.
namespace zm {

inline constexpr std::size_t kDibHeaderBytes = 40;

/// What the bytes before the pixels tell.
struct TZmDibInfo {
    std::int32_t width = 0;   ///< at least 1
    std::int32_t height = 0;  ///< at least 1
    bool is_top_down = false;
    std::int32_t bit_count = 0;            ///< 1, 4, 8, 16, 24 or 32
    std::array<std::uint32_t, 4> masks{};  ///< red, green, blue, alpha, at 16 and 32 bits
    std::vector<TRGB> palette;             ///< up to 8 bits; colours that lack are black
    std::int64_t row_bytes = 0;            ///< padding included
    std::size_t pixel_offset = 0;          ///< of a packed bitmap, from its start
};

/// Reads the header (of 12 bytes, or of 40 and more), masks and colour table, all within `bytes`.
/// Nothing for other headers, for sizes below 1, for run-length and embedded data, and when the
/// bytes end too soon.
std::optional<TZmDibInfo> ParseDibInfo(std::span<const std::uint8_t> bytes);

/// Writes the info header of an uncompressed picture, bottom row first, with its colour table of
/// `palette` behind it. Resolutions in dots per inch; 0 for none.
std::vector<std::uint8_t> MakeDibInfo(std::int32_t width, std::int32_t height,
                                      std::int32_t bit_count, const std::vector<TRGB>& palette,
                                      std::int32_t dpi_x, std::int32_t dpi_y);

}  // namespace zm
