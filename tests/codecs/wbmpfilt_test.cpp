#include "engine/codecs/wbmpfilt.h"

#include <gtest/gtest.h>

#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

// 10 x 2: type, flags, width, height; the left half white, then the right half.
const TBytes kSmall{0, 0, 10, 2, 0xF8, 0x00, 0x07, 0xC0};

bool Read(const TBytes& bytes, TZmBitmap& bitmap, TIOParams& params, bool params_only = false) {
    TBorrowedMemoryStream stream(bytes.data(), static_cast<std::int64_t>(bytes.size()));
    test::TTestProgress progress;
    ReadWBMPStream(stream, bitmap, params, params_only, progress.record);
    return !progress.aborting;
}

TBytes Written(TZmBitmap& bitmap) {
    TMemoryStream stream;
    test::TTestProgress progress;
    WriteWBMPStream(stream, bitmap, progress.record);
    EXPECT_FALSE(progress.aborting);
    return stream.Bytes();
}

TEST(WBMP, ReadsBitsAndFillsTheParameters) {
    TZmBitmap bitmap;
    TIOParams params;
    ASSERT_TRUE(Read(kSmall, bitmap, params));
    EXPECT_EQ(zm1g, bitmap.GetPixelFormat());
    for (std::int32_t x = 0; x < 10; ++x) {
        EXPECT_EQ(x < 5, bitmap.GetPixels_zm1g(x, 0)) << x;
        EXPECT_EQ(x >= 5, bitmap.GetPixels_zm1g(x, 1)) << x;
    }
    EXPECT_EQ((TRGB{255, 255, 255}), bitmap.GetPixels(0, 0));
    EXPECT_EQ(10, params.fWidth);
    EXPECT_EQ(2, params.fOriginalHeight);
    EXPECT_EQ(1, params.fBitsPerSample);
    EXPECT_EQ(1, params.fSamplesPerPixel);
    EXPECT_EQ(1, params.GetImageCount());
    EXPECT_EQ(kSmall, Written(bitmap));
}

TEST(WBMP, LeavesTheStreamBehindTheImage) {
    TBytes two = kSmall;
    two.insert(two.end(), kSmall.begin(), kSmall.end());
    TBorrowedMemoryStream stream(two.data(), static_cast<std::int64_t>(two.size()));
    for (const std::int64_t end : {8, 16}) {
        TZmBitmap bitmap;
        TIOParams params;
        test::TTestProgress progress;
        ReadWBMPStream(stream, bitmap, params, false, progress.record);
        EXPECT_FALSE(progress.aborting);
        EXPECT_EQ(end, stream.GetPosition());
    }
}

TEST(WBMP, NumbersOfSeveralBytes) {
    const auto bitmap = test::MakeGradient(zm1g, 301, 129);
    const TBytes bytes = Written(*bitmap);
    EXPECT_EQ((TBytes{0, 0, 0x82, 0x2D, 0x81, 0x01}), test::FirstBytes(bytes, 6));
    EXPECT_EQ(6u + 38u * 129u, bytes.size());
    TZmBitmap loaded;
    TIOParams params;
    ASSERT_TRUE(Read(bytes, loaded, params));
    test::ExpectSamePixels(*bitmap, loaded);
}

TEST(WBMP, OtherFormatsGoOutAsACopyInTwoLevels) {
    const auto bitmap = test::MakeGradient(zm24RGB, 33, 16);
    const auto before = std::make_unique<TZmBitmap>(*bitmap);
    TZmBitmap expected(*bitmap);
    ASSERT_TRUE(expected.SetPixelFormat(zm1g));
    EXPECT_EQ(Written(expected), Written(*bitmap));
    test::ExpectSamePixels(*before, *bitmap);
}

TEST(WBMP, RefusesDamage) {
    for (std::size_t size = 0; size < kSmall.size(); ++size) {
        TZmBitmap bitmap;
        TIOParams params;
        EXPECT_FALSE(Read(test::FirstBytes(kSmall, size), bitmap, params)) << size;
    }
    const TBytes others[] = {
        {1, 0, 10, 2, 0xF8, 0, 7, 0xC0},                                     // another type
        {0, 0x80, 10, 2, 0xF8, 0, 7, 0xC0},                                  // extensions
        {0, 0, 0, 2, 0xF8, 0, 7, 0xC0},                                      // no width
        {0, 0, 10, 0, 0xF8, 0, 7, 0xC0},                                     // no height
        {0, 0, 0x88, 0x80, 0x80, 0x80, 0x00, 1, 0},                          // 2^31 pixels wide
        {0, 0, 0x87, 0xFF, 0xFF, 0xFF, 0x7F, 0x87, 0xFF, 0xFF, 0xFF, 0x7F},  // 2^31 - 1 each
        TBytes(64, 0x80),  // a number without an end
    };
    for (const TBytes& bytes : others) {
        TZmBitmap bitmap;
        TIOParams params;
        EXPECT_FALSE(Read(bytes, bitmap, params));
        EXPECT_TRUE(bitmap.IsEmpty());
    }
}

TEST(WBMP, ParametersOnlyLeaveTheBitmap) {
    TZmBitmap bitmap(3, 3, zm24RGB);
    TIOParams params;
    EXPECT_TRUE(Read(test::FirstBytes(kSmall, 4), bitmap, params, /*params_only=*/true));
    EXPECT_EQ(10, params.fWidth);
    EXPECT_EQ(3, bitmap.GetWidth());
}

TEST(WBMP, TellsAFullTarget) {
    const auto bitmap = test::MakeGradient(zm1g, 20, 20);
    for (const bool raises : {false, true}) {
        test::TFullStream full(10, raises);
        test::TTestProgress progress;
        WriteWBMPStream(full, *bitmap, progress.record);
        EXPECT_TRUE(progress.aborting);
    }
}

}  // namespace
}  // namespace zm
