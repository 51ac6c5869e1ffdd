#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <string>
#include <vector>

#include "engine/codecs/jpegfilt.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/codecs/jpegraw.h"

/// What the tests of the JPEG codec load with.
namespace zm::test {

struct TLoadedJpeg {
    TZmBitmap bitmap;
    TIOParams params;
    TTestProgress progress;
    TJpegReadOptions options;
};

inline void Load(TLoadedJpeg& loaded, const std::vector<std::uint8_t>& bytes) {
    TBorrowedMemoryStream stream(bytes.data(), static_cast<std::int64_t>(bytes.size()));
    ReadJPEGStream(stream, loaded.bitmap, loaded.options, loaded.progress.record, loaded.params);
}

inline void ExpectColors(const TRawJpeg& raw, TZmBitmap& bitmap) {
    ASSERT_TRUE(raw.is_good);
    ASSERT_EQ(bitmap.GetPixelFormat(), zm24RGB);
    ASSERT_EQ(bitmap.GetWidth(), raw.width);
    ASSERT_EQ(bitmap.GetHeight(), raw.height);
    for (std::int32_t y = 0; y < raw.height; ++y) {
        for (std::int32_t x = 0; x < raw.width; ++x) {
            ASSERT_EQ(bitmap.GetPixels_zm24RGB(x, y), RawColor(raw, x, y))
                << "x " << x << " y " << y;
        }
    }
}

/// Place of the first marker of a type.
inline std::size_t FindMarker(const std::vector<std::uint8_t>& bytes, std::uint8_t type) {
    const std::uint8_t marker[2] = {0xFF, type};
    return static_cast<std::size_t>(std::search(bytes.begin(), bytes.end(), marker, marker + 2) -
                                    bytes.begin());
}

}  // namespace zm::test
