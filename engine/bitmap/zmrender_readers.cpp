/// The display adjustments of single values.

#include "engine/bitmap/zmrender_readers_p.h"

#include <algorithm>
#include <cmath>

#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr double kFactorOne = 65536.0;
// Beyond these every channel is at an end of the scale already; products keep to 64 bits.
constexpr double kLargestFactor = 4294967296.0;
constexpr std::int32_t kLargestOffset = 1 << 30;

/// The factor of a contrast with 16 fractional bits, truncated.
std::int64_t ContrastFactor_q16(std::int32_t contrast) {
    const double factor = contrast < 0 ? 1.0 - std::sqrt(-static_cast<double>(contrast)) / 10.0
                                       : contrast / 10.0 + 1.0;
    return static_cast<std::int64_t>(std::min(factor * kFactorOne, kLargestFactor));
}

}  // namespace

std::uint8_t StretchGray(double value, double low, double high, double black, double white) {
    const double limited = std::min(std::max(value, low), high);
    return Clamp8(TruncToInt((limited - black) / (white - black) * 255.0));
}

std::uint8_t AdjustChannel(std::uint8_t value, std::int32_t offset, std::int32_t contrast,
                           double black, double white) {
    std::int64_t channel = value;
    if (offset != 0 || contrast != 0) {
        const std::int64_t limited_offset = std::clamp(offset, -kLargestOffset, kLargestOffset);
        const std::int64_t centered = channel + limited_offset - 128;
        // A quotient, not a shift: it rounds towards zero.
        channel = centered * ContrastFactor_q16(contrast) / 65536 + 128;
        channel = std::clamp<std::int64_t>(channel, 0, 255);
    }
    if (black != white) {
        const std::int32_t ends[] = {TruncToInt(black), TruncToInt(white)};
        return StretchGray(static_cast<double>(channel), std::min(ends[0], ends[1]),
                           std::max(ends[0], ends[1]), black, white);
    }
    return static_cast<std::uint8_t>(channel);
}

std::vector<std::uint8_t> MakeGrayTable(std::int32_t count, double black, double white) {
    std::vector<std::uint8_t> table(static_cast<std::size_t>(count));
    const std::int32_t low = std::min(TruncToInt(black), TruncToInt(white));
    const std::int32_t high = std::max(TruncToInt(black), TruncToInt(white));
    for (std::int32_t value = 0; value < count; ++value) {
        table[static_cast<std::size_t>(value)] =
            black == white ? static_cast<std::uint8_t>(value * 256 / count)
                           : StretchGray(value, low, high, black, white);
    }
    return table;
}

}  // namespace zm
