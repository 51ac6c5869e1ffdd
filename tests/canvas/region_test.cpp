// Regions of an image that are drawn on apart, and the canvases of a bitmap.
#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <memory>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/canvas/zmgdiplus.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();

TEST(RegionTest, ATransparentRegionComesBackByItsAlpha) {
    TZmBitmap image(8, 6, zm24RGB);
    image.Fill(0.0);
    image.AlphaFill(0);
    auto region = image.CreateROIBitmap({-2, 1, 4, 9}, /*PerformAlphaCompositing=*/true);
    ASSERT_NE(region, nullptr);
    EXPECT_EQ(region->GetPixelFormat(), zm32RGB);
    EXPECT_EQ(region->GetWidth(), 6);
    EXPECT_EQ(region->GetHeight(), 8);
    EXPECT_EQ(region->GetPixels_zm32RGB(5, 7), TRGBA{});
    region->SetPixels_zm32RGB(2, 0, {50, 60, 70, 200});  // 0, 1 of the image
    region->SetPixels_zm32RGB(1, 0, {50, 60, 70, 255});  // outside
    region->SetPixels_zm32RGB(5, 7, {50, 60, 70, 255});  // below
    EXPECT_EQ(image.GetAlpha(0, 1), 0) << "not before the region goes";
    region.reset();
    EXPECT_EQ(image.GetPixels(0, 1), (TRGB{50, 60, 70}));
    EXPECT_EQ(image.GetAlpha(0, 1), 200);
    image.SetPixels(0, 1, {});
    image.SetAlpha(0, 1, 0);
    TZmBitmap blank(8, 6, zm24RGB);
    blank.Fill(0.0);
    blank.AlphaFill(0);
    ExpectSamePixels(blank, image);
    ExpectSameAlpha(blank, image);
}

TEST(RegionTest, ACopiedRegionReplacesPixelsAndLeavesThePlane) {
    for (int ordinal = zm1g; ordinal <= zm32RGB; ++ordinal) {
        const auto format = static_cast<TZmPixelFormat>(ordinal);
        for (const TRect& rect : {TRect{2, 1, 7, 5}, TRect{-3, -2, 30, 20}, TRect{8, 4, 40, 9}}) {
            auto image = MakeNoise(format, 21, 6, 3);
            AddNoiseAlpha(*image, 7);
            TZmBitmap before(*image);
            image->CreateROIBitmap(rect, /*PerformAlphaCompositing=*/false).reset();
            ExpectSamePixels(before, *image);  // an untouched copy changes nothing, at any depth
            auto region = image->CreateROIBitmap(rect, /*PerformAlphaCompositing=*/false);
            ASSERT_NE(region, nullptr);
            const std::int32_t x = 5 - rect.left;
            const std::int32_t y = 4 - rect.top;
            if (rect.left <= 5) {
                EXPECT_EQ(region->GetPixels(x, y), before.GetPixels(5, 4)) << "format " << ordinal;
                region->SetPixels(x, y, {0, 0, 0});
                before.SetPixels(5, 4, {0, 0, 0});
            }
            region.reset();
            ExpectSamePixels(before, *image);
            ExpectSameAlpha(before, *image);
        }
    }
}

TEST(RegionTest, RectanglesAnywhere) {
    auto image = MakeNoise(zm24RGB, 9, 7, 1);
    TZmBitmap before(*image);
    for (const bool compositing : {true, false}) {
        for (const TRect& rect : {TRect{3, 3, 3, 9}, TRect{5, 2, 2, 9}, TRect{kMin, 0, kMax, 1},
                                  TRect{0, kMin, kMax, kMax}}) {
            EXPECT_EQ(image->CreateROIBitmap(rect, compositing), nullptr);
            EXPECT_EQ(image->CreateROICanvas(rect, true, true, compositing), nullptr);
        }
        for (const TRect& rect :
             {TRect{kMin, kMin, kMin + 4, kMin + 4}, TRect{kMax - 4, kMax - 4, kMax, kMax},
              TRect{9, 7, 12, 12}, TRect{-3, -3, 0, 0}}) {
            auto region = image->CreateROIBitmap(rect, compositing);
            ASSERT_NE(region, nullptr);
            region->Fill(TRGBA{1, 2, 3, 255});
        }
    }
    ExpectSamePixels(before, *image);
    TZmBitmap empty;
    EXPECT_EQ(empty.CreateROIBitmap({0, 0, 5, 5}, true), nullptr);
}

TEST(RegionTest, ACanvasTakesItsRegionAlong) {
    TZmBitmap image(40, 30, zm48RGB);
    image.Fill(0.0);
    auto canvas = image.CreateROICanvas({10, 5, 40, 30}, /*AntiAlias=*/true, /*UseGDIPlus=*/true,
                                        /*PerformAlphaCompositing=*/true);
    ASSERT_NE(canvas, nullptr);
    canvas->GetBrush().SetColor(0x0000FF);
    canvas->FillRect({2, 3, 7, 9});  // without its last column and row
    canvas.reset();
    for (std::int32_t y = 0; y < 30; ++y) {
        for (std::int32_t x = 0; x < 40; ++x) {
            const bool is_inside = x >= 12 && x < 16 && y >= 8 && y < 13;
            EXPECT_EQ(image.GetPixels(x, y), is_inside ? (TRGB{0, 0, 255}) : TRGB{})
                << x << ", " << y;
        }
    }
}

TEST(RegionTest, TheCanvasesOfABitmap) {
    auto image = MakeNoise(zm24RGB, 12, 9, 2);
    TZmBitmap before(*image);
    image->GetCanvasFont().Name = u"DejaVu Serif";
    TCanvas* const canvas = image->GetCanvas();
    ASSERT_NE(canvas, nullptr);
    EXPECT_EQ(image->GetLocation(), zmTBitmap);
    ExpectSamePixels(before, *image);
    EXPECT_EQ(canvas->Font.Name, u"DejaVu Serif");
    canvas->Font.Color = 77;
    EXPECT_EQ(image->GetCanvasFont().Color, 77) << "one font, seen from both";
    EXPECT_EQ(image->GetCanvas(), canvas);
    TZmCanvas* const smooth = image->GetZmCanvas();
    ASSERT_NE(smooth, nullptr);
    EXPECT_EQ(&smooth->GetCanvas(), canvas);
    smooth->GetBrush().SetColor(0x00FF00);
    smooth->FillRect({0, 0, 3, 3});
    smooth->Flush();
    EXPECT_EQ(image->GetPixels(1, 1), (TRGB{0, 255, 0}));
    ASSERT_TRUE(image->Allocate(5, 5, zm24RGB));
    EXPECT_NE(image->GetZmCanvas(), nullptr) << "made anew with the pixels";

    TZmBitmap empty;
    EXPECT_EQ(empty.GetCanvas(), nullptr);
    EXPECT_EQ(empty.GetZmCanvas(), nullptr);
    TZmBitmap deep(4, 4, zm48RGB);
    EXPECT_THROW(deep.GetCanvas(), EZmException);
    EXPECT_EQ(deep.GetWidth(), 4) << "and is as it was";
}

}  // namespace
}  // namespace zm::test
