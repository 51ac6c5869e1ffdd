#pragma once

#include <cstdint>
#include <memory>

#include "engine/bitmap/zmxBitmaps.h"

/// Pictures for the tests of drawing.
namespace zm::test {

inline constexpr TRGB kWhite{255, 255, 255};
inline constexpr TRGB kUntouched{1, 2, 3};

/// zm24RGB: blue tells the column, green the row.
inline std::unique_ptr<TZmBitmap> MakeMap(std::int32_t width, std::int32_t height) {
    auto bitmap = std::make_unique<TZmBitmap>(width, height, zm24RGB);
    for (std::int32_t y = 0; y < height; ++y) {
        for (std::int32_t x = 0; x < width; ++x) {
            bitmap->SetPixels_zm24RGB(
                x, y, TRGB{static_cast<std::uint8_t>(x), static_cast<std::uint8_t>(y), 77});
        }
    }
    return bitmap;
}

inline std::unique_ptr<TZmBitmap> MakeFilled(std::int32_t width, std::int32_t height, TRGB color) {
    auto bitmap = std::make_unique<TZmBitmap>(width, height, zm24RGB);
    bitmap->Fill(static_cast<double>(ColorFromRGB(color)));
    return bitmap;
}

}  // namespace zm::test
