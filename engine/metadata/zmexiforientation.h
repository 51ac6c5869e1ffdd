#pragma once

#include <cstdint>
#include <span>

namespace zm {

/// How a picture lies in its file (EXIF, tag 0x0112): 1 upright; 2 mirrored left to right; 3 upside
/// down; 4 mirrored top to bottom; 5 mirrored along the falling diagonal; 6 to be turned clockwise;
/// 7 mirrored along the rising diagonal; 8 to be turned counter-clockwise.
inline constexpr std::int32_t kOrientationUpright = 1;
inline constexpr std::int32_t kOrientationLast = 8;

/// The orientation in the first directory of an EXIF block (a TIFF structure, without the prefix
/// that JPEG markers put before it). 0 when the block has none, another value than 1 to 8, or
/// is damaged; no byte outside the block is looked at.
std::int32_t ReadExifOrientation(std::span<const std::uint8_t> block);

/// Puts another value in its place. False, and nothing changed, where ReadExifOrientation gives 0.
bool SetExifOrientation(std::span<std::uint8_t> block, std::int32_t orientation);

}  // namespace zm
