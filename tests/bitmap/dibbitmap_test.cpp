/// Device-independent bitmaps: the section class, packed bytes both ways.

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "engine/bitmap/zmdib.h"
#include "engine/bitmap/zmdibbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmbytereader.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr TRGB kRed{0, 0, 255};
constexpr TRGB kGreen{0, 255, 0};

// The section.

TEST(DibBitmap, HoldsThreeDepths) {
    TZmDibbitmap dib;
    ASSERT_TRUE(dib.AllocateBits(5, 3, 24));
    EXPECT_EQ(dib.GetRowLen(), 16);
    EXPECT_EQ(dib.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(dib.GetScanLine(0), dib.GetBits() + 32);  // the top row is the last in memory
    EXPECT_EQ(dib.GetScanLine(2)[14], 0);
    ASSERT_TRUE(dib.AllocateBits(33, 1, 1));
    EXPECT_EQ(dib.GetRowLen(), 8);
    EXPECT_EQ(dib.GetPalette(1), (TRGB{255, 255, 255}));
    ASSERT_TRUE(dib.AllocateBits(2, 2, 8));
    EXPECT_EQ(dib.GetPaletteLen(), 256);
    EXPECT_TRUE(dib.Allocate(4, 4, zm1g));
    EXPECT_TRUE(dib.Allocate(4, 4, zm24RGB));
}

TEST(DibBitmap, RefusesWhatItCannotHold) {
    TZmDibbitmap dib;
    for (const TZmPixelFormat format : {zmnull, zm8p, zm8g, zm16g, zm32f, zmCMYK, zm32RGB}) {
        EXPECT_FALSE(dib.Allocate(4, 4, format));
    }
    ASSERT_TRUE(dib.AllocateBits(4, 4, 24));
    EXPECT_FALSE(dib.AllocateBits(4, 4, 32));
    EXPECT_EQ(dib.GetWidth(), 0);
    EXPECT_EQ(dib.GetBits(), nullptr);
    EXPECT_FALSE(dib.AllocateBits(0, 4, 24));
    EXPECT_FALSE(dib.AllocateBits(4, -1, 24));
    EXPECT_FALSE(dib.AllocateBits(2147483647, 1, 24));
    EXPECT_FALSE(dib.AllocateBits(65536, 65536, 24));
}

TEST(DibBitmap, CannotBeResized) {
    TZmDibbitmap dib;
    ASSERT_TRUE(dib.AllocateBits(4, 4, 24));
    try {
        dib.SetWidth(5);
        ADD_FAILURE() << "no exception";
    } catch (const EZmException& error) {
        EXPECT_STREQ(error.what(), "Cannot resize TZmDibBitmap");
    }
    EXPECT_THROW(dib.SetHeight(4), EZmException);
    EXPECT_EQ(dib.GetWidth(), 4);
}

TEST(DibBitmap, ExchangesPixelsWithImages) {
    for (const TZmPixelFormat format : {zm1g, zm8g, zm24RGB}) {
        const auto source = MakeNoise(format, 37, 9, 6);
        TZmDibbitmap dib;
        ASSERT_TRUE(source->CopyToTDibBitmap(&dib, 0, 0, 37, 9));
        EXPECT_EQ(dib.GetBitCount(), source->GetBitCount());
        TZmBitmap copy(2, 2, zm32f);
        copy.AlphaFill(3);
        ASSERT_TRUE(copy.CopyFromTDibBitmap(&dib));
        ExpectSamePixels(*source, copy);
        EXPECT_FALSE(copy.HasAlphaChannel());
        TZmDibbitmap assigned;
        assigned.Assign(source.get());
        ASSERT_TRUE(copy.CopyFromTDibBitmap(&assigned));
        ExpectSamePixels(*source, copy);
    }
    TZmBitmap untouched(3, 3, zm8g);
    TZmDibbitmap empty;
    EXPECT_FALSE(untouched.CopyFromTDibBitmap(nullptr));
    EXPECT_FALSE(untouched.CopyFromTDibBitmap(&empty));
    EXPECT_EQ(untouched.GetWidth(), 3);
    TZmBitmap deep(3, 3, zm48RGB);
    EXPECT_FALSE(deep.CopyToTDibBitmap(&empty, 0, 0, 3, 3));
}

TEST(DibBitmap, TakesRectanglesThatLeaveTheImage) {
    const auto source = MakeNoise(zm24RGB, 4, 4, 9);
    TZmDibbitmap dib;
    ASSERT_TRUE(source->CopyToTDibBitmap(&dib, -1, 3, 3, 2));
    EXPECT_EQ(dib.GetWidth(), 3);
    const std::uint8_t* const top = dib.GetScanLine(0);
    EXPECT_EQ(top[0] | top[1] | top[2], 0);  // left of the image
    EXPECT_EQ(std::memcmp(top + 3, source->GetPPixels_zm24RGB(0, 3), 6), 0);
    EXPECT_EQ(dib.GetScanLine(1)[4], 0);  // below it
}

TEST(DibBitmap, MergesIntoImagesClipped) {
    TZmDibbitmap dib;
    ASSERT_TRUE(dib.Allocate(3, 3, ColorFromRGB(kRed), 255));
    TZmBitmap image(4, 4, zm24RGB);
    image.Fill(0.0);
    image.MergeFromTDibBitmap(&dib, 2, -2);
    EXPECT_EQ(image.GetPixels_zm24RGB(2, 0), kRed);
    EXPECT_EQ(image.GetPixels_zm24RGB(3, 0), kRed);
    EXPECT_EQ(image.GetPixels_zm24RGB(1, 0), TRGB{});
    EXPECT_EQ(image.GetPixels_zm24RGB(2, 1), TRGB{});
}

TEST(DibBitmap, CopiesToAPlatformBitmap) {
    const auto source = MakeNoise(zm1g, 11, 3, 2);
    TZmDibbitmap dib;
    dib.Assign(source.get());
    TBitmap platform_bitmap;
    dib.CopyToTBitmap(&platform_bitmap);
    EXPECT_EQ(platform_bitmap.GetPixelFormat(), pf1bit);
    EXPECT_EQ(platform_bitmap.ColorTable()[1], (TRGB{255, 255, 255}));
    EXPECT_EQ(std::memcmp(platform_bitmap.GetScanLine(1), source->GetScanLine(1), 1), 0);
}

// Packed bytes.

/// A header of `header_bytes` bytes; compression and fields behind follow as given.
std::vector<std::uint8_t> Header(std::uint32_t header_bytes, std::int32_t width,
                                 std::int32_t height, std::uint32_t bits,
                                 std::uint32_t compression = 0) {
    std::vector<std::uint8_t> dib(header_bytes, 0);
    PutU32LE(&dib[0], header_bytes);
    PutU32LE(&dib[4], static_cast<std::uint32_t>(width));
    PutU32LE(&dib[8], static_cast<std::uint32_t>(height));
    PutU16LE(&dib[12], 1);
    PutU16LE(&dib[14], bits);
    PutU32LE(&dib[16], compression);
    return dib;
}

void Append(std::vector<std::uint8_t>& dib, const std::vector<std::uint8_t>& bytes) {
    dib.insert(dib.end(), bytes.begin(), bytes.end());
}

bool Take(TZmBitmap& bitmap, const std::vector<std::uint8_t>& dib) {
    return bitmap.CopyFromDIB(dib.data(), static_cast<std::int64_t>(dib.size()));
}

TEST(Dib, TakesEveryDepth) {
    struct TCase {
        const char* name;
        std::vector<std::uint8_t> header, bytes;
        TZmPixelFormat format;
        std::vector<TRGB> pixels;  // row by row
    };
    constexpr TRGB kWhite{255, 255, 255};
    const std::vector<std::uint8_t> core = {12, 0, 0, 0, 1, 0, 1, 0, 1, 0, 1, 0};
    const std::vector<std::uint8_t> red_green = {0, 0, 255, 0, 0, 255, 0, 0};
    std::vector<std::uint8_t> two_colours = Header(40, 3, 1, 4);
    two_colours[32] = 2;  // of sixteen; the others are black
    const TCase cases[] = {
        {"bottom up", Header(40, 1, 2, 24), red_green, zm24RGB, {kGreen, kRed}},
        {"top down", Header(40, 1, -2, 24), red_green, zm24RGB, {kRed, kGreen}},
        {"bits of which 0 is white",
         Header(40, 3, 1, 1),
         {255, 255, 255, 0, 0, 0, 0, 0, 0xA0, 0, 0, 0},
         zm1g,
         {TRGB{}, kWhite, TRGB{}}},
        {"bits of other colours",
         Header(40, 2, 1, 1),
         {255, 255, 254, 0, 0, 0, 0, 0, 0x80, 0, 0, 0},
         zm24RGB,
         {TRGB{}, TRGB{255, 255, 254}}},
        {"nibbles",
         two_colours,
         {1, 2, 3, 0, 4, 5, 6, 0, 0x10, 0xF0, 0, 0},
         zm24RGB,
         {TRGB{4, 5, 6}, TRGB{1, 2, 3}, TRGB{}}},
        {"entries of three bytes", core, {0, 0, 255, 0, 255, 0, 0x80, 0, 0, 0}, zm24RGB, {kGreen}},
        {"5-5-5", Header(40, 2, 1, 16), {0xFF, 0x7F, 0x00, 0x7C}, zm24RGB, {kWhite, kRed}},
        {"5-6-5, masks behind the header",  // 32 * 255 / 63 = 129.5, 16 * 255 / 31 = 131.6
         Header(40, 2, 1, 16, 3),
         {0, 0xF8, 0, 0, 0xE0, 0x07, 0, 0, 0x1F, 0, 0, 0, 0x00, 0x04, 0x10, 0x00},
         zm24RGB,
         {TRGB{0, 130, 0}, TRGB{132, 0, 0}}},
        {"three masks, not four",
         Header(40, 1, 1, 32, 3),
         {0xFF, 0, 0, 0, 0, 0xFF, 0, 0, 0, 0, 0xFF, 0, 1, 2, 3, 4},
         zm24RGB,
         {TRGB{3, 2, 1}}},
    };
    for (const TCase& test : cases) {
        SCOPED_TRACE(test.name);
        std::vector<std::uint8_t> dib = test.header;
        Append(dib, test.bytes);
        TZmBitmap bitmap;
        ASSERT_TRUE(Take(bitmap, dib));
        EXPECT_EQ(bitmap.GetPixelFormat(), test.format);
        EXPECT_FALSE(bitmap.HasAlphaChannel());
        for (std::size_t i = 0; i < test.pixels.size(); ++i) {
            const auto at = static_cast<std::int32_t>(i);
            const std::int32_t width = bitmap.GetWidth();
            EXPECT_EQ(bitmap.GetPixels(at % width, at / width), test.pixels[i]) << i;
        }
    }
}

TEST(Dib, TakesAlphaOfALongHeader) {
    std::vector<std::uint8_t> dib = Header(124, 2, 1, 32, 3);
    PutU32LE(&dib[40], 0x00FF0000);
    PutU32LE(&dib[44], 0x0000FF00);
    PutU32LE(&dib[48], 0x000000FF);
    PutU32LE(&dib[52], 0xFF000000);
    Append(dib, {1, 2, 3, 0, 4, 5, 6, 128});
    TZmBitmap bitmap;
    ASSERT_TRUE(Take(bitmap, dib));
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(1, 0), (TRGB{4, 5, 6}));
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 0);
    EXPECT_EQ(bitmap.GetAlpha(1, 0), 128);
    dib.back() = 0;  // alpha that was never filled in
    ASSERT_TRUE(Take(bitmap, dib));
    EXPECT_FALSE(bitmap.HasAlphaChannel());
}

TEST(Dib, IsWrittenAsTheFormatWants) {
    TZmBitmap bitmap(1, 2, zm24RGB);
    bitmap.SetPixels_zm24RGB(0, 0, kGreen);
    bitmap.SetPixels_zm24RGB(0, 1, kRed);
    std::vector<std::uint8_t> expected = Header(40, 1, 2, 24);
    expected[20] = 8;               // bytes of the pixels
    PutU32LE(&expected[24], 7874);  // 200 / 2.54 * 100
    PutU32LE(&expected[28], 3937);  // 100 / 2.54 * 100
    Append(expected, {0, 0, 255, 0, 0, 255, 0, 0});
    EXPECT_EQ(bitmap.CreateDIB(200, 100), expected);
    EXPECT_TRUE(TZmBitmap().CreateDIB(0, 0).empty());
}

TEST(Dib, BringsBackWhatItCanHold) {
    struct TCase {
        TZmPixelFormat from;
        TZmPixelFormat back;
    };
    for (const TCase& test : {TCase{zm1g, zm1g},
                              {zm8g, zm8g},
                              {zm24RGB, zm24RGB},
                              {zm8p, zm24RGB},
                              {zm16g, zm8g},
                              {zm32RGB, zm24RGB},
                              {zm48RGB, zm24RGB},
                              {zmCMYK, zm24RGB}}) {
        SCOPED_TRACE(test.from);
        const auto source = MakeNoise(test.from, 21, 6, 5);
        TZmBitmap copy;
        ASSERT_TRUE(Take(copy, source->CreateDIB(96, 96)));
        TZmBitmap expected(*source);
        ASSERT_TRUE(expected.SetPixelFormat(test.back));
        ExpectSamePixels(expected, copy);
    }
}

TEST(Dib, HoldsARectangle) {
    const auto source = MakeNoise(zm24RGB, 9, 7, 5);
    TZmBitmap copy;
    ASSERT_TRUE(Take(copy, source->CreateDIB(2, 1, 4, 100)));
    EXPECT_EQ(copy.GetWidth(), 3);
    EXPECT_EQ(copy.GetHeight(), 6);
    EXPECT_EQ(copy.GetPixels_zm24RGB(0, 0), source->GetPixels_zm24RGB(2, 1));
    EXPECT_EQ(copy.GetPixels_zm24RGB(2, 5), source->GetPixels_zm24RGB(4, 6));
    EXPECT_TRUE(source->CreateDIB(9, 0, 12, 3).empty());
}

TEST(Dib, MayComeInTwoParts) {
    const std::vector<std::uint8_t> info = Header(40, 1, 1, 24);
    const std::vector<std::uint8_t> pixels = {7, 8, 9};  // the last row without its padding
    TZmBitmap bitmap;
    ASSERT_TRUE(bitmap.CopyFromDIB(info.data(), 40, pixels.data(), 3));
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(0, 0), (TRGB{7, 8, 9}));
    EXPECT_FALSE(bitmap.CopyFromDIB(info.data(), 40, pixels.data(), 2));
    EXPECT_FALSE(bitmap.CopyFromDIB(info.data(), 39, pixels.data(), 3));
    EXPECT_FALSE(bitmap.CopyFromDIB(nullptr, 40, pixels.data(), 3));
    EXPECT_FALSE(bitmap.CopyFromDIB(info.data(), -1, pixels.data(), 3));
}

void ExpectRefused(const std::vector<std::uint8_t>& dib, const std::string& what) {
    const auto before = MakeNoise(zm24RGB, 8, 8, 4);
    TZmBitmap bitmap(*before);
    EXPECT_FALSE(Take(bitmap, dib)) << what;
    ExpectSamePixels(*before, bitmap);
}

TEST(Dib, IsRefusedWhenItEndsTooSoon) {
    std::vector<std::uint8_t> dib = Header(40, 3, 2, 8);
    PutU32LE(&dib[32], 4);
    Append(dib, std::vector<std::uint8_t>(4 * 4 + 4 + 3, 1));
    TZmBitmap bitmap;
    ASSERT_TRUE(Take(bitmap, dib));
    for (std::size_t size = 0; size < dib.size(); ++size) {
        ExpectRefused({dib.begin(), dib.begin() + static_cast<std::ptrdiff_t>(size)},
                      std::to_string(size) + " bytes");
    }
}

TEST(Dib, IsRefusedWhenItIsNone) {
    struct TCase {
        const char* what;
        std::size_t offset;
        std::uint32_t value;
    };
    const TCase cases[] = {
        {"header of 16 bytes", 0, 16},
        {"header beyond the data", 0, 0x7FFFFFFF},
        {"header with the sign bit", 0, 0xFFFFFFFF},
        {"width 0", 4, 0},
        {"width -1", 4, 0xFFFFFFFF},
        {"width 2^31 - 1", 4, 0x7FFFFFFF},
        {"height 0", 8, 0},
        {"height 2^31 - 1", 8, 0x7FFFFFFF},
        {"height -2^31", 8, 0x80000000},
        {"depth 0", 14, 0},
        {"depth 2", 14, 2},
        {"run-length data", 16, 1},
        {"masks at 8 bits", 16, 3},
        {"257 colours", 32, 257},
        {"2^32 - 1 colours", 32, 0xFFFFFFFF},
    };
    for (const TCase& test : cases) {
        std::vector<std::uint8_t> dib = Header(40, 3, 2, 8);
        Append(dib, std::vector<std::uint8_t>(1024 + 8, 1));
        PutU32LE(&dib[test.offset], test.value);
        ExpectRefused(dib, test.what);
    }
}

}  // namespace
}  // namespace zm::test
