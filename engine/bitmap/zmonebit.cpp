#include "engine/bitmap/zmonebit_p.h"

#include <array>
#include <cstring>

#include "engine/bitmap/zmrowconvert_fast_p.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// First index x mod 8, second y mod 8.
constexpr std::uint8_t kOrderedMatrix[8][8] = {
    {0, 32, 8, 40, 2, 34, 10, 42},  {48, 16, 56, 24, 50, 18, 58, 26},
    {12, 44, 4, 36, 14, 46, 6, 38}, {60, 28, 52, 20, 62, 30, 54, 22},
    {3, 35, 11, 43, 1, 33, 9, 41},  {51, 19, 59, 27, 49, 17, 57, 25},
    {15, 47, 7, 39, 13, 45, 5, 37}, {63, 31, 55, 23, 61, 29, 53, 21},
};

constexpr std::int32_t kLevelOfSingleGray = 127;
constexpr std::int32_t kMaxLevelSteps = 256;

/// Packs what `is_set(x)` says, eight pixels a byte.
template <typename Predicate>
void PackBits(std::uint8_t* dest, std::int32_t width, Predicate&& is_set) {
    const std::int32_t whole = width & ~7;
    for (std::int32_t x = 0; x < whole; x += 8) {
        unsigned byte = 0;
        for (std::int32_t i = 0; i < 8; ++i) {
            byte = byte << 1 | (is_set(x + i) ? 1u : 0u);
        }
        *dest++ = static_cast<std::uint8_t>(byte);
    }
    unsigned byte = 0;
    for (std::int32_t x = whole; x < width; ++x) {
        byte |= is_set(x) ? 0x80u >> (x & 7) : 0u;
    }
    if (whole < width) {
        *dest = static_cast<std::uint8_t>(byte);
    }
}

/// Pixels done by the fast function, 0 when the processor has none.
std::int32_t RunFastBitsAbove(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                              const std::uint8_t* levels) {
    const TZmBitsAboveFunction run = FindFastBitsAbove();
    return run != nullptr ? run(gray, dest, width, levels) : 0;
}

struct TMean {
    std::int64_t count = 0;
    std::int64_t sum = 0;
    double Value() const { return static_cast<double>(sum) / static_cast<double>(count); }
};

/// Mean of the pixels with a value of `first` to `last`.
TMean MeanOf(const TGrayHistogram& histogram, std::int32_t first, std::int32_t last) {
    TMean mean;
    for (std::int32_t value = first; value <= last; ++value) {
        const std::int64_t count = histogram[static_cast<std::size_t>(value)];
        mean.count += count;
        mean.sum += count * value;
    }
    return mean;
}

}  // namespace

void PlainOrderedBitsFromGray(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                              std::int32_t y) {
    PackBits(dest, width,
             [gray, y](std::int32_t x) { return kOrderedMatrix[x & 7][y & 7] < gray[x] >> 2; });
}

/// An entry lies below a grey's quarter when the grey lies above four times the entry plus 3.
void OrderedBitsFromGray(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                         std::int32_t y) {
    std::array<std::uint8_t, 8> levels{};
    for (std::size_t x = 0; x < levels.size(); ++x) {
        levels[x] = static_cast<std::uint8_t>(kOrderedMatrix[x][y & 7] * 4 + 3);
    }
    const std::int32_t done = RunFastBitsAbove(gray, dest, width, levels.data());
    PlainOrderedBitsFromGray(gray + done, dest + done / 8, width - done, y);
}

void OrderedBitsFromFloat(const std::uint8_t* values, std::uint8_t* dest, std::int32_t width,
                          std::int32_t y) {
    // Required: the entries run to 63 while the value is at most 1, so that only the places with
    // entry 0 are ever set; earlier results are to be reproduced.
    PackBits(dest, width, [values, y](std::int32_t x) {
        float value = 0.0f;
        std::memcpy(&value, values + std::int64_t{x} * 4, sizeof value);
        const float limited = value > 0.0f ? (value < 1.0f ? value : 1.0f) : 0.0f;
        return !(kOrderedMatrix[x & 7][y & 7] >= static_cast<double>(limited) / 2.0);
    });
}

void PlainThresholdBits(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                        std::int32_t level) {
    PackBits(dest, width, [gray, level](std::int32_t x) { return gray[x] > level; });
}

void ThresholdBits(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                   std::int32_t level) {
    std::int32_t done = 0;
    if (level >= 0 && level <= 255) {
        std::array<std::uint8_t, 8> levels{};
        levels.fill(static_cast<std::uint8_t>(level));
        done = RunFastBitsAbove(gray, dest, width, levels.data());
    }
    PlainThresholdBits(gray + done, dest + done / 8, width - done, level);
}

void AddToHistogram(const std::uint8_t* gray, std::int32_t width, TGrayHistogram& histogram) {
    for (std::int32_t x = 0; x < width; ++x) {
        ++histogram[gray[x]];
    }
}

std::int32_t FindAutomaticLevel(const TGrayHistogram& histogram) {
    const TMean all = MeanOf(histogram, 0, 255);
    if (all.count == 0) {
        return kLevelOfSingleGray;
    }
    std::int32_t level = TruncToInt(all.Value());
    for (std::int32_t step = 0; step < kMaxLevelSteps; ++step) {
        const TMean dark = MeanOf(histogram, 0, level);
        const TMean light = MeanOf(histogram, level + 1, 255);
        if (dark.count == 0 || light.count == 0) {
            return kLevelOfSingleGray;
        }
        const std::int32_t next = TruncToInt((dark.Value() + light.Value()) / 2.0);
        if (next == level) {
            break;
        }
        level = next;
    }
    return level;
}

}  // namespace zm
