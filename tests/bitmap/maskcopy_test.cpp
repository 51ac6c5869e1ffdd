#include <gtest/gtest.h>

#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "tests/bitmap/place_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();

/// A mask of noise, about one pixel in three 0 and one in three 255.
void FillWithNoise(TZmMask& mask, std::uint32_t seed) {
    for (std::int32_t y = 0; y < mask.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < mask.GetWidth(); ++x) {
            seed = seed * 1664525u + 1013904223u;
            const auto value = static_cast<std::int32_t>(seed >> 20 & 255);
            const std::uint32_t kind = (seed >> 28) % 3;
            mask.SetPixel(x, y, kind == 0 ? 0 : kind == 1 ? 255 : value);
        }
    }
}

/// One pixel of a format from bytes, and back.
void SetBytes(TZmBitmap& bitmap, const std::vector<std::uint8_t>& bytes) {
    std::memcpy(bitmap.GetScanLine(0), bytes.data(), bytes.size());
}

TEST(MaskCopy, MixesTheChannelsOfEachFormat) {
    struct TCase {
        TZmPixelFormat format;
        std::int32_t mask;
        std::vector<std::uint8_t> dest, source, result;
    };
    const TCase kCases[] = {
        {zm8g, 0, {100}, {200}, {100}},
        {zm8g, 1, {100}, {200}, {100}},    // 100.39
        {zm8g, 2, {100}, {200}, {101}},    // 100.78
        {zm8g, 128, {100}, {200}, {150}},  // 150.20
        {zm8g, 254, {200}, {100}, {100}},  // 100.39
        {zm8g, 255, {100}, {200}, {200}},
        {zm24RGB, 128, {100, 0, 255}, {200, 255, 0}, {150, 128, 127}},
        {zm32RGB, 51, {0, 10, 20, 255}, {255, 10, 30, 0}, {51, 10, 22, 204}},
        {zmCMYK, 51, {0, 10, 20, 255}, {255, 10, 30, 0}, {51, 10, 22, 204}},
        {zm16g, 128, {0, 0}, {0xFF, 0xFF}, {0x80, 0x80}},  // 65535 * 128 / 255 = 32896.06
        {zm16g, 255, {1, 2}, {0xFE, 0xFF}, {0xFE, 0xFF}},
        {zm48RGB, 255, {1, 2, 3, 4, 5, 6}, {9, 8, 7, 6, 5, 4}, {9, 8, 7, 6, 5, 4}},
        {zm48RGB, 85, {0, 1, 0, 2, 0, 3}, {0, 4, 0, 2, 0, 0}, {0, 2, 0, 2, 0, 2}},
        // L unsigned; a from -128 to 127, b from 127 to -128, at half and at 1 of 255.
        {zmCIELab, 128, {200, 0x80, 0x7F}, {100, 0x7F, 0x80}, {150, 0, 0xFF}},
        {zmCIELab, 1, {200, 0x80, 0x7F}, {100, 0x7F, 0x80}, {200, 0x81, 0x7E}},
        {zm32f, 51, {0, 0, 0x80, 0x3F}, {0, 0, 0xC0, 0x40}, {0, 0, 0, 0x40}},  // 1, 6: 2
        {zm32f, 0, {1, 2, 3, 4}, {0, 0, 0xC0, 0x7F}, {1, 2, 3, 4}},
        {zm1g, 127, {0}, {0x80}, {0}},
        {zm1g, 128, {0}, {0x80}, {0x80}},
        {zm1g, 128, {0xFF}, {0x7F}, {0x7F}},
    };
    for (const TCase& test : kCases) {
        TZmBitmap dest(1, 1, test.format);
        TZmBitmap source(1, 1, test.format);
        SetBytes(dest, test.dest);
        SetBytes(source, test.source);
        TZmMask mask;
        ASSERT_TRUE(mask.AllocateBits(1, 1, 8));
        mask.SetPixel(0, 0, test.mask);
        mask.CopyZmBitmap(&dest, &source, 0, 0);
        const std::uint8_t* const row = dest.GetScanLine(0);
        EXPECT_EQ(std::vector<std::uint8_t>(row, row + test.result.size()), test.result)
            << PixelFormatInfo(test.format).name << " mask " << test.mask;
    }
}

TEST(MaskCopy, TakesPaletteIndexesOrTheNearestColour) {
    TZmBitmap dest(4, 1, zm8p);
    for (std::int32_t i = 0; i < 256; ++i) {
        const auto gray = static_cast<std::uint8_t>(i / 2);  // two indexes a colour
        dest.SetPalette(i, TRGB{gray, gray, gray});
    }
    TZmBitmap source(dest);
    dest.Fill(101.0);
    source.Fill(201.0);
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(4, 1, 8));
    mask.SetPixel(1, 0, 255);
    mask.SetPixel(2, 0, 128);
    mask.SetPixel(3, 0, 1);
    mask.CopyZmBitmap(&dest, &source, 0, 0);
    EXPECT_EQ(dest.GetPixels_zm8(0, 0), 101);  // the index stays, though 100 has its colour
    EXPECT_EQ(dest.GetPixels_zm8(1, 0), 201);
    EXPECT_EQ(dest.GetPixels_zm8(2, 0), 150);  // grey 75
    EXPECT_EQ(dest.GetPixels_zm8(3, 0), 100);  // grey 50
    TZmBitmap other(4, 1, zm8p);
    other.SetPalette(7, TRGB{60, 60, 60});
    other.Fill(7.0);
    mask.CopyZmBitmap(&dest, &other, 0, 0);
    EXPECT_EQ(dest.GetPixels_zm8(1, 0), 120);
}

TEST(MaskCopy, OfOneBitEqualsACopyOfPixels) {
    for (const TZmPixelFormat from : kAllFormats) {
        for (const TZmPixelFormat to : kAllFormats) {
            if (from != to && from != zm24RGB && to != zm24RGB) {
                continue;
            }
            const auto source = MakeNoise(from, 13, 6, 1);
            const auto dest = MakeNoise(to, 21, 9, 2);
            TZmBitmap expected(*dest);
            TZmMask mask;
            ASSERT_TRUE(mask.AllocateBits(19, 8, 1));
            FillWithNoise(mask, 3);
            for (std::int32_t y = 0; y < 6; ++y) {
                for (std::int32_t x = 0; x < 13; ++x) {
                    if (mask.IsPointInside(x + 7, y + 1)) {
                        source->CopyRectTo(&expected, x, y, x + 7, y + 1, 1, 1, false);
                    }
                }
            }
            mask.CopyZmBitmap(dest.get(), source.get(), 7, 1);
            SCOPED_TRACE(PixelFormatInfo(from).name);
            ExpectSamePixels(expected, *dest);
        }
    }
}

TEST(MaskCopy, ClipsToAllThreeAndWritesNothingAround) {
    struct TCase {
        std::int32_t left, top, mask_width, mask_height;
    };
    constexpr TCase kCases[] = {{0, 0, 40, 40},  {-4, -2, 40, 40},   {5, 3, 6, 4},
                                {6, 1, 7, 40},   {9, 0, 40, 40},     {0, 4, 40, 40},
                                {kMin, 0, 9, 9}, {kMax, kMax, 9, 9}, {-12, 0, 9, 9},
                                {-13, 0, 9, 9},  {-12, -6, 1, 1}};
    for (const TZmPixelFormat format : kAllFormats) {
        for (const TCase& test : kCases) {
            const auto bits = PixelFormatInfo(format).bit_count;
            const auto row_bytes = static_cast<std::size_t>(CalcRowLen(9, bits, 32).value());
            std::vector<std::uint8_t> memory(row_bytes * 6, 0xA5);
            TZmBitmap dest(memory.data() + row_bytes, 9, 4, format);
            const auto source = MakeNoise(format, 13, 7, 5);
            source->CopyPaletteTo(&dest);
            TZmBitmap expected(dest);
            TZmMask mask;
            ASSERT_TRUE(mask.AllocateBits(test.mask_width, test.mask_height, 8));
            mask.Fill(255);
            mask.CopyZmBitmap(&dest, source.get(), test.left, test.top);
            for (std::int32_t y = 0; y < 4; ++y) {
                for (std::int32_t x = 0; x < 9; ++x) {
                    const std::int64_t from_x = std::int64_t{x} - test.left;
                    const std::int64_t from_y = std::int64_t{y} - test.top;
                    if (from_x >= 0 && from_x < 13 && from_y >= 0 && from_y < 7 &&
                        x < test.mask_width && y < test.mask_height) {
                        source->CopyRectTo(&expected, static_cast<std::int32_t>(from_x),
                                           static_cast<std::int32_t>(from_y), x, y, 1, 1, false);
                    }
                }
            }
            ExpectSamePixels(expected, dest);
            const auto used = static_cast<std::size_t>((9 * bits + 7) / 8);
            for (std::size_t i = 0; i < memory.size(); ++i) {
                const bool is_pixel =
                    i / row_bytes >= 1 && i / row_bytes <= 4 && i % row_bytes < used;
                ASSERT_TRUE(is_pixel || memory[i] == 0xA5) << "byte " << i;
            }
        }
    }
}

TEST(MaskCopy, WritesTheBoundingBoxBack) {
    TZmBitmap image(6, 5, zm8g);
    image.Fill(10.0);
    image.AlphaFill(255);
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(6, 5, 8));
    mask.SetPixel(2, 1, 255);
    mask.SetPixel(4, 3, 51);
    TZmBitmap box(image, TRect{mask.GetX1(), mask.GetY1(), mask.GetX2() + 1, mask.GetY2() + 1});
    EXPECT_EQ(box.GetWidth(), 3);
    box.Fill(60.0);
    box.AlphaFill(5);
    int calls = 0;
    image.SetOnChanged([&calls](void*) { ++calls; });
    mask.CopyZmBitmap(&image, &box, mask.GetX1(), mask.GetY1());
    EXPECT_EQ(calls, 1);
    mask.CopyZmBitmapAlpha(&image, &box, mask.GetX1(), mask.GetY1());
    EXPECT_EQ(image.GetPixels_zm8(2, 1), 60);
    EXPECT_EQ(image.GetPixels_zm8(4, 3), 20);
    EXPECT_EQ(image.GetPixels_zm8(3, 2), 10);
    EXPECT_EQ(image.GetAlpha(2, 1), 5);
    EXPECT_EQ(image.GetAlpha(4, 3), 205);
    EXPECT_EQ(image.GetAlpha(3, 2), 255);
    EXPECT_FALSE(image.GetAlphaChannelRaw()->GetFull());
    box.RemoveAlphaChannel(false, 0);
    mask.CopyZmBitmapAlpha(&image, &box, 0, 0);
    EXPECT_EQ(image.GetAlpha(2, 1), 5);
}

TEST(MaskCopy, WorksOnPlatformBitmaps) {
    TBitmap dest;
    TBitmap source;
    ASSERT_TRUE(dest.SetSize(3, 1, pf24bit));
    ASSERT_TRUE(source.SetSize(3, 1, pf24bit));
    std::memset(source.GetScanLine(0), 200, 9);
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(3, 1, 8));
    mask.SetPixel(1, 0, 255);
    mask.CopyBitmap(&dest, &source, 0, 0);
    EXPECT_EQ(dest.GetScanLine(0)[2], 0);
    EXPECT_EQ(dest.GetScanLine(0)[3], 200);
    EXPECT_EQ(dest.GetScanLine(0)[6], 0);
    EXPECT_TRUE(dest.GetModified());
}

TEST(MaskCopy, OfNothingDoesNothing) {
    TZmBitmap empty;
    TZmBitmap image(2, 2, zm8g);
    image.Fill(3.0);
    TZmMask none;
    none.CopyZmBitmap(&image, &image, 0, 0);
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(2, 2, 8));
    mask.Fill(255);
    mask.CopyZmBitmap(&image, &empty, 0, 0);
    mask.CopyZmBitmap(&empty, &image, 0, 0);
    mask.CopyZmBitmap(&image, nullptr, 0, 0);
    mask.CopyZmBitmap(nullptr, &image, 0, 0);
    EXPECT_EQ(image.GetPixels_zm8(1, 1), 3);
}

TEST(MaskCombine, LowersToThePlane) {
    for (const TZmPixelFormat format : {zm8g, zm8p}) {
        TZmBitmap plane(2, 2, format);
        plane.SetPixels_zm8(0, 0, 0);
        plane.SetPixels_zm8(1, 0, 90);
        plane.SetPixels_zm8(0, 1, 200);
        plane.SetPixels_zm8(1, 1, 255);
        TZmMask bytes;
        ASSERT_TRUE(bytes.AllocateBits(4, 3, 8));
        bytes.Fill(150);
        bytes.CombineWithAlpha(&plane, 2, 1, false);
        EXPECT_EQ(bytes.GetPixel(2, 1), 0);
        EXPECT_EQ(bytes.GetPixel(3, 1), 90);
        EXPECT_EQ(bytes.GetPixel(2, 2), 150);
        EXPECT_EQ(bytes.GetPixel(3, 2), 150);
        EXPECT_EQ(bytes.GetPixel(1, 1), 150);  // beyond the plane
        TZmMask bits;
        ASSERT_TRUE(bits.AllocateBits(4, 3, 1));
        bits.Fill(255);
        bits.CombineWithAlpha(&plane, 0, 0, false);
        EXPECT_FALSE(bits.IsPointInside(0, 0));
        EXPECT_TRUE(bits.IsPointInside(1, 0));
        EXPECT_FALSE(bits.GetFull());
    }
}

TEST(MaskCombine, BringsTheRectangleUpToDateWhenAsked) {
    TZmBitmap plane(4, 3, zm8g);
    plane.Fill(0.0);
    plane.SetPixels_zm8(2, 1, 7);
    TZmBitmap colors(4, 3, zm24RGB);
    colors.Fill(0.0);
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(4, 3, 8));
    mask.Fill(255);
    mask.CombineWithAlpha(&plane, 0, 0, false);
    EXPECT_EQ(mask.GetX2(), 3);
    mask.CombineWithAlpha(&plane, 0, 0, true);
    EXPECT_EQ(mask.GetX1(), 2);
    EXPECT_EQ(mask.GetY2(), 1);
    mask.CombineWithAlpha(&colors, 0, 0, true);
    mask.CombineWithAlpha(&plane, kMin, kMax, true);
    mask.CombineWithAlpha(nullptr, 0, 0, true);
    EXPECT_EQ(mask.GetPixel(2, 1), 7);
}

// Outlines.

/// The canvas as rows: W white, B black, '.' the grey that it had.
std::vector<std::string> CanvasRows(TBitmap& canvas) {
    std::vector<std::string> rows;
    for (std::int32_t y = 0; y < canvas.GetHeight(); ++y) {
        std::string row;
        for (std::int32_t x = 0; x < canvas.GetWidth(); ++x) {
            const std::uint8_t value = canvas.GetScanLine(y)[3 * x];
            row += value == 255 ? 'W' : value == 0 ? 'B' : '.';
        }
        rows.push_back(row);
    }
    return rows;
}

void FillCanvas(TBitmap& canvas, std::int32_t width, std::int32_t height) {
    ASSERT_TRUE(canvas.SetSize(width, height, pf24bit));
    for (std::int32_t y = 0; y < height; ++y) {
        std::memset(canvas.GetScanLine(y), 100, static_cast<std::size_t>(width) * 3);
    }
}

TEST(MaskOutline, DashesTheBorderAtAZoom) {
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(4, 3, 1));
    mask.SetRectangle(1, 0, 3, 2, 1);
    TBitmap canvas;
    FillCanvas(canvas, 6, 5);
    mask.DrawOutline(&canvas, TZmMaskView{1, 1, 1.0, 0});
    // White where (x + y) mod 8 is below 4.
    EXPECT_EQ(CanvasRows(canvas),
              (std::vector<std::string>{"......", "..WBB.", "..B.B.", "..BBB.", "......"}));
    FillCanvas(canvas, 6, 5);
    mask.DrawOuter(&canvas, TZmMaskView{1, 1, 1.0, 1});
    EXPECT_EQ(CanvasRows(canvas),
              (std::vector<std::string>{"..WBB.", ".W...B", ".B...W", ".B...W", "..BWW."}));
    FillCanvas(canvas, 6, 5);
    mask.DrawOutline(&canvas, TZmMaskView{-2, 0, 2.0, 4});  // the left column begins at 0
    EXPECT_EQ(CanvasRows(canvas),
              (std::vector<std::string>{"BBBBWW", "B....W", "B....W", "B....B", "W....B"}));
}

TEST(MaskOutline, InvertsTheCanvasThereAndBack) {
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(3, 3, 8));
    mask.SetPixel(1, 1, 3);
    TBitmap canvas;
    FillCanvas(canvas, 3, 3);
    mask.InvertCanvas(&canvas, TZmMaskView{});
    EXPECT_EQ(canvas.GetScanLine(1)[3], 155);
    EXPECT_EQ(canvas.GetScanLine(1)[0], 100);
    mask.InvertCanvas(&canvas, TZmMaskView{});
    EXPECT_EQ(canvas.GetScanLine(1)[3], 100);
    mask.InvertCanvas(&canvas, TZmMaskView{0, 0, 1.0, 4});  // a black dash
    EXPECT_EQ(canvas.GetScanLine(1)[3], 100);
}

TEST(MaskOutline, TakesAnyPlaceAndZoom) {
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(3, 3, 1));
    mask.Fill(1);
    TBitmap canvas;
    FillCanvas(canvas, 4, 4);
    const auto before = CanvasRows(canvas);
    constexpr double kNoNumber = std::numeric_limits<double>::quiet_NaN();
    for (const double zoom : {0.0, -1.0, kNoNumber, std::numeric_limits<double>::infinity()}) {
        mask.DrawOutline(&canvas, TZmMaskView{0, 0, zoom, 0});
    }
    mask.DrawOutline(&canvas, TZmMaskView{kMin, kMax, 1e300, kMax});
    mask.DrawOuter(&canvas, TZmMaskView{kMax, kMin, 1e-300, kMin});
    mask.DrawOutline(nullptr, TZmMaskView{});
    EXPECT_EQ(CanvasRows(canvas), before);
    mask.DrawOutline(&canvas, TZmMaskView{0, 0, 0.4, 0});  // columns 0 and 2 are shown
    EXPECT_EQ(CanvasRows(canvas)[0].substr(0, 3), "WW.");
    TBitmap empty;
    mask.DrawOutline(&empty, TZmMaskView{});
}

}  // namespace
}  // namespace zm::test
