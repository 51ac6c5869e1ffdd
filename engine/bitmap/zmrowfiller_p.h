#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// The bytes of one pixel; for zm1g the first byte is not 0 when bits are to be set.
struct TPixelPattern {
    std::array<std::uint8_t, 8> bytes{};
    std::size_t size = 1;
};

/// The pixel that a fill value means in a format (see TZmBitmap::Fill).
TPixelPattern MakePattern(TZmPixelFormat format, double value);

/// Writes runs of one pixel into rows.
class TRowFiller {
public:
    /// `longest_run`: pixels of the longest run that will be asked for.
    TRowFiller(TZmPixelFormat format, const TPixelPattern& pattern, std::int32_t longest_run);
    void Fill(std::uint8_t* row, std::int32_t x, std::int64_t count) const;

private:
    TPixelPattern pattern_;
    bool is_one_bit_;
    std::vector<std::uint8_t> run_;  // empty where the pixel's bytes are all the same
};

}  // namespace zm
