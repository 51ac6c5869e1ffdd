#pragma once

#include <array>
#include <cstdint>

/// Grey rows to rows of one bit. The unused bits of the last byte become 0.
namespace zm {

/// Sets the bits of pixels whose grey, in 64 levels, lies above the entry of a fixed 8 by 8
/// matrix for their place. `y` is the row's number in the image.
void OrderedBitsFromGray(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                         std::int32_t y);

/// The same pixel by pixel: the rule as stated, whose bits OrderedBitsFromGray gives.
void PlainOrderedBitsFromGray(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                              std::int32_t y);

/// As OrderedBitsFromGray for a row of floats, against the halved value itself.
void OrderedBitsFromFloat(const std::uint8_t* values, std::uint8_t* dest, std::int32_t width,
                          std::int32_t y);

/// Sets the bits of pixels whose grey is above `level`.
void ThresholdBits(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                   std::int32_t level);

/// The same pixel by pixel.
void PlainThresholdBits(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                        std::int32_t level);

using TGrayHistogram = std::array<std::int64_t, 256>;

/// Counts the values of a row.
void AddToHistogram(const std::uint8_t* gray, std::int32_t width, TGrayHistogram& histogram);

/// The automatic level between dark and light, found by an iterative search of two means: start
/// at the mean of all pixels, take the mean of the pixels up to the level and the mean of those
/// above it, go on with the middle of the two (truncated, as the first mean is) until it stays.
/// A picture of a single grey has no second mean: the level is then 127.
std::int32_t FindAutomaticLevel(const TGrayHistogram& histogram);

}  // namespace zm
