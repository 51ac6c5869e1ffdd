#pragma once

#include <bit>
#include <cstdint>

#include "engine/bitmap/zmrowconvert.h"

/// Row functions of the formats with a colour model of their own, and the pixel formulas that
/// several rows share.
namespace zm {

// Words and 32-bit pixels are read and written as the processor has them.
static_assert(std::endian::native == std::endian::little);

/// A float of 0 to 1 times `scale`, truncated. Values outside are limited first, not-a-number
/// counts as 0.
inline std::int32_t UnitToInteger(float value, double scale) {
    const float limited = value > 0.0f ? (value < 1.0f ? value : 1.0f) : 0.0f;
    return static_cast<std::int32_t>(static_cast<double>(limited) * scale);
}

void RowCMYKTo24RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                    const TZmRowContext& context);
void RowCMYKTo32RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                    const TZmRowContext& context);
void Row24RGBToCMYK(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                    const TZmRowContext& context);
void RowCIELabTo24RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                      const TZmRowContext& context);
void RowCIELabTo32RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                      const TZmRowContext& context);
void Row24RGBToCIELab(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                      const TZmRowContext& context);

}  // namespace zm
