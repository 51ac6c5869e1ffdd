#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/proc/zmresample_p.h"
#include "tests/support/instructionsets.h"

/// Small pictures written out as numbers, for the resampling tests.
namespace zm::test {

using TMatrix = std::vector<std::vector<int>>;

inline constexpr TZmPixelFormat kAllFormats[] = {zm1g,  zm8p,   zm8g,    zm16g,    zm24RGB,
                                                 zm32f, zmCMYK, zm48RGB, zmCIELab, zm32RGB};

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
                case zm16g: bitmap->SetPixels_zm16g(x, y, static_cast<std::uint16_t>(value)); break;
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

/// A picture in borrowed memory: rows of odd length with guard bytes at both ends of the block.
class TGuardedPicture {
public:
    TGuardedPicture(TZmPixelFormat format, std::int32_t width, std::int32_t height,
                    std::size_t offset)
        : offset_(kGuard + offset) {
        bitmap_.SetBitAlignment(8);
        const auto row = static_cast<std::size_t>(width) *
                         static_cast<std::size_t>(PixelFormatInfo(format).bit_count) / 8;
        size_ = row * static_cast<std::size_t>(height);
        block_.assign(offset_ + size_ + kGuard, kMark);
        bitmap_.EncapsulateMemory(block_.data() + offset_, width, height, format,
                                  /*do_free_image=*/true, zmboTOPLEFT);
    }
    TZmBitmap& Bitmap() { return bitmap_; }
    void ExpectGuardsIntact() const {
        for (std::size_t i = 0; i < block_.size(); ++i) {
            if (i < offset_ || i >= offset_ + size_) {
                ASSERT_EQ(block_[i], kMark) << "guard byte " << i;
            }
        }
    }

private:
    static constexpr std::size_t kGuard = 64;
    static constexpr std::uint8_t kMark = 0xA5;
    std::size_t offset_;
    std::size_t size_ = 0;
    std::vector<std::uint8_t> block_;
    TZmBitmap bitmap_;
};

/// What a picture holds: noise, or values near rounding ties.
enum TContent : std::uint8_t { kNoiseContent, kTwoLevels, kSteps, kContentCount };

inline void FillContent(TZmBitmap& bitmap, TContent content, std::uint32_t seed) {
    const std::int64_t bytes =
        static_cast<std::int64_t>(bitmap.GetWidth()) * bitmap.GetBitCount() / 8;
    std::uint32_t state = seed;
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        std::uint8_t* row = bitmap.GetScanLine(y);
        for (std::int64_t i = 0; i < bytes; ++i) {
            state = state * 1664525u + 1013904223u;
            const auto byte = static_cast<std::uint8_t>(state >> 24);
            row[i] = content == kNoiseContent ? byte
                     : content == kTwoLevels  ? (byte < 128 ? 0 : 255)
                                              : static_cast<std::uint8_t>(byte & 1);
        }
    }
}

inline const TResampleListener kNobody;

/// Runs a body once for each instruction set at every sixth width, and once at the others, which
/// bounds the time that comparisons over all sizes take.
template <typename Body>
void ForSomeInstructionSets(std::int32_t width, Body&& body) {
    if (width % 6 == 4) {
        ForEachInstructionSet(body);
    } else {
        body();
    }
}

}  // namespace zm::test
