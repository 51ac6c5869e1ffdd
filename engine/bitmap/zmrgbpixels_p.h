#pragma once

#include <cstdint>

#include "engine/bitmap/zmrowconvert.h"

/// Runs of pixels of any format as RGB, both ways: what pixel access in RGB and copies between
/// formats share.
namespace zm {

/// How a row stores its pixels.
struct TZmRowLayout {
    TZmPixelFormat format = zmnull;
    const TRGB* palette = nullptr;  ///< 256 entries for zm8p
    std::int32_t palette_used = 0;  ///< entries that a colour may be stored as
    TZmRowContext context;
};

/// `width` pixels from column x as RGB.
void LoadRGBPixels(const std::uint8_t* row, std::int32_t x, std::int32_t width,
                   const TZmRowLayout& layout, TRGB* pixels);

/// Stores RGB pixels from column x on: in zm1g a colour is set from grey 128 on, in zm8p it
/// becomes the nearest palette entry (the first of equally near ones), elsewhere the row
/// conversions apply; the fourth byte of zm32RGB becomes 255.
void StoreRGBPixels(const TRGB* pixels, std::uint8_t* row, std::int32_t x, std::int32_t width,
                    const TZmRowLayout& layout);

}  // namespace zm
