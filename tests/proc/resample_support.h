#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/proc/zmresample_p.h"

/// Small pictures written out as numbers, for the resampling tests.
namespace zm::test {

using TMatrix = std::vector<std::vector<int>>;

/// A zm1g, zm8g or zm16g picture from its values, top row first.
inline std::unique_ptr<TZmBitmap> GrayPicture(TZmPixelFormat format, const TMatrix& values) {
    const auto height = static_cast<std::int32_t>(values.size());
    const auto width = static_cast<std::int32_t>(values.at(0).size());
    auto bitmap = std::make_unique<TZmBitmap>(width, height, format);
    for (std::int32_t y = 0; y < height; ++y) {
        for (std::int32_t x = 0; x < width; ++x) {
            const int value = values[static_cast<std::size_t>(y)][static_cast<std::size_t>(x)];
            switch (format) {
                case zm1g: bitmap->SetPixels_zm1g(x, y, value != 0); break;
                case zm16g:
                    bitmap->SetPixels_zm16g(x, y, static_cast<std::uint16_t>(value));
                    break;
                default: bitmap->SetPixels_zm8(x, y, static_cast<std::uint8_t>(value)); break;
            }
        }
    }
    return bitmap;
}

/// A zm24RGB picture with equal channels.
inline std::unique_ptr<TZmBitmap> ColorPicture(const TMatrix& values) {
    auto bitmap = GrayPicture(zm8g, values);
    bitmap->SetPixelFormat(zm24RGB);
    return bitmap;
}

/// The values of a grey picture; of zm24RGB the value that all channels have, -1 where they
/// differ.
inline TMatrix ValuesOf(TZmBitmap& bitmap) {
    TMatrix values;
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        auto& row = values.emplace_back();
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
            switch (bitmap.GetPixelFormat()) {
                case zm1g: row.push_back(bitmap.GetPixels_zm1g(x, y) ? 1 : 0); break;
                case zm16g: row.push_back(bitmap.GetPixels_zm16g(x, y)); break;
                case zm24RGB: {
                    const TRGB rgb = bitmap.GetPixels_zm24RGB(x, y);
                    row.push_back(rgb.r == rgb.g && rgb.g == rgb.b ? rgb.r : -1);
                    break;
                }
                default: row.push_back(bitmap.GetPixels_zm8(x, y)); break;
            }
        }
    }
    return values;
}

/// A target of another size and the same format.
inline std::unique_ptr<TZmBitmap> TargetFor(TZmBitmap& source, std::int32_t width,
                                            std::int32_t height) {
    return std::make_unique<TZmBitmap>(width, height, source.GetPixelFormat());
}

inline const TResampleListener kNobody;

}  // namespace zm::test
