#pragma once

#include <cstdint>

#include "engine/bitmap/zmblend.h"

/// Rows of the renderer: blend operations, and the mixing of a source into a destination by
/// weights of 0 to 255. Each has a plain form, which is the law, and a fast one that gives the
/// same bytes. The rows given to one call do not overlap.
namespace zm {

/// dest + (source - dest) * weight / 256, rounded down, in the arithmetic of the renderer: the
/// product of difference and weight shifted to 18 fractional bits and back, low byte kept. The
/// full weight of 255 leaves 1/256 of the destination.
constexpr std::uint8_t MixChannel(std::uint8_t source, std::uint8_t dest, std::uint8_t weight) {
    const std::int32_t weight_q18 = weight << 10;
    return static_cast<std::uint8_t>(dest + (((source - dest) * weight_q18) >> 18));
}

/// Weights from alpha bytes: the smaller of alpha and limit, times a factor of at most 65536,
/// truncated to 16 fractional bits less.
struct TMixRule {
    std::uint8_t limit = 255;
    std::uint32_t factor_q16 = 65536;

    constexpr std::uint8_t WeightOf(std::uint8_t alpha) const {
        const std::uint32_t limited = alpha < limit ? alpha : limit;
        return static_cast<std::uint8_t>(limited * factor_q16 >> 16);
    }
};

/// ZmBlendPixel on each pair of pixels: dest = operation(source, dest).
void BlendRowPlain(const TRGB* source, TRGB* dest, std::int32_t width, std::uint8_t operation,
                   std::uint8_t row);
/// BlendRowPlain with zmlSoftLight, from a table of 64 KiB that the first call makes.
void SoftLightRow(const TRGB* source, TRGB* dest, std::int32_t width);
/// As BlendRowPlain; operations that work channel by channel without divisions run in vectors,
/// zmlSoftLight from its table.
void BlendRow(const TRGB* source, TRGB* dest, std::int32_t width, std::uint8_t operation,
              std::uint8_t row);

/// MixChannel on all channels, the weight of each pixel by its alpha.
void MixRowPlain(const TRGB* source, const std::uint8_t* alpha, const TMixRule& rule, TRGB* dest,
                 std::int32_t width);
void MixRow(const TRGB* source, const std::uint8_t* alpha, const TMixRule& rule, TRGB* dest,
            std::int32_t width);

/// MixChannel on all channels with the same weight.
void MixRowEvenly(const TRGB* source, std::uint8_t weight, TRGB* dest, std::int32_t width);

}  // namespace zm
