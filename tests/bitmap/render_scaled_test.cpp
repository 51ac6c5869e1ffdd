#include <gtest/gtest.h>

#include <array>
#include <limits>
#include <memory>
#include <random>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmrendercanvas.h"
#include "engine/bitmap/zmvirtualbitmaps.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/proc/zmresample.h"
#include "tests/bitmap/place_support.h"
#include "tests/bitmap/render_support.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

using test::ExpectSamePixels;
using test::kUntouched;
using test::kWhite;
using test::MakeFilled;
using test::MakeGradient;
using test::MakeMap;
using test::MakeNoise;

// The scaled path.

/// A picture scaled by the resampler itself.
std::unique_ptr<TZmBitmap> Resampled(TZmBitmap& source, std::int32_t width, std::int32_t height,
                                     TResampleFilter filter) {
    auto scaled = std::make_unique<TZmBitmap>(width, height, source.GetPixelFormat());
    EXPECT_TRUE(ResampleBitmapInto(source, *scaled, filter, nullptr, {}));
    return scaled;
}

TEST(Render, ScalesTheWholePictureAsTheResamplerDoes) {
    for (const TZmPixelFormat format : {zm8g, zm16g, zm24RGB, zm48RGB}) {
        for (const TResampleFilter filter : {rfBilinear, rfTriangle, rfFastLinear}) {
            for (const std::int32_t side : {7, 31}) {
                auto source = MakeGradient(format, 16, 16);
                auto dest = MakeFilled(side, side, kUntouched);
                source->DrawToTZmBitmap(dest.get(), TRect{0, 0, side, side}, TRect{0, 0, 16, 16},
                                        filter);
                auto scaled = Resampled(*source, side, side, filter);
                auto expected = MakeFilled(side, side, kUntouched);
                scaled->DrawToTZmBitmap(expected.get(), 0, 0);
                ExpectSamePixels(*expected, *dest);
            }
        }
    }
}

TEST(Render, ScalesAlphaAlong) {
    auto source = MakeFilled(16, 16, kWhite);
    source->AlphaFill(255);
    for (std::int32_t y = 0; y < 16; ++y) {
        for (std::int32_t x = 0; x < 8; ++x) {
            source->SetAlpha(x, y, 0);
        }
    }
    auto dest = MakeFilled(8, 8, TRGB{});
    source->DrawToTZmBitmap(dest.get(), TRect{0, 0, 8, 8}, TRect{0, 0, 16, 16}, rfBilinear);
    EXPECT_EQ(0, dest->GetPixels_zm24RGB(3, 4).g);
    EXPECT_EQ(254, dest->GetPixels_zm24RGB(4, 4).g);
    // Opacity acts once on a picture with a plane, also when it is scaled.
    dest->Fill(0.0);
    source->RenderToTZmBitmapEx(dest.get(), 0, 0, 8, 8, 0, 0, 16, 16, true, 255, rfBilinear,
                                zmlNormal, 0.5);
    EXPECT_EQ(126, dest->GetPixels_zm24RGB(4, 4).g);
    dest->Fill(0.0);
    source->RenderToTZmBitmapEx(dest.get(), 0, 0, 8, 8, 0, 0, 16, 16, false, 255, rfBilinear,
                                zmlAdd, 0.5);
    EXPECT_EQ(62, dest->GetPixels_zm24RGB(0, 4).g);
}

TEST(Render, ScalesTheVisiblePartOnly) {
    auto source = MakeMap(40, 40);
    auto dest = MakeFilled(20, 20, kUntouched);
    TZmLookupTable columns = {5, 5, 5};
    const TRect update{10, 4, 15, 8};
    source->RenderToTZmBitmap(dest.get(), &columns, nullptr, &update, 0, 0, 20, 20, 0, 0, 40, 40,
                              true, false, 255, rfBilinear, false, zmlNormal, 1.0);
    EXPECT_EQ((TZmLookupTable{5, 5, 5}), columns);  // belongs to the unscaled picture
    for (std::int32_t y = 0; y < 20; ++y) {
        for (std::int32_t x = 0; x < 20; ++x) {
            const TRGB color = dest->GetPixels_zm24RGB(x, y);
            const bool is_inside = x >= 10 && x < 15 && y >= 4 && y < 8;
            ASSERT_EQ(is_inside ? 77 : 3, color.r) << x << ", " << y;
            if (is_inside) {  // means of two neighbours, 0.5 to even
                EXPECT_NEAR(2 * x + 0.5, color.b, 0.5);
                EXPECT_NEAR(2 * y + 0.5, color.g, 0.5);
            }
        }
    }
}

TEST(Render, ShrinkingBitsTakesEveryBlackPixelIntoAccount) {
    for (const std::int32_t side : {5, 7, 12}) {
        for (std::int32_t position = 0; position < 20; ++position) {
            TZmBitmap source(20, 20, zm1g);
            source.Fill(1.0);
            source.SetPixels_zm1g(position, 19 - position, false);
            auto dest = MakeFilled(side, side, TRGB{});
            source.DrawToTZmBitmap(dest.get(), TRect{0, 0, side, side}, TRect{0, 0, 20, 20},
                                   rfTriangle);
            int darkened = 0;
            for (std::int32_t i = 0; i < side * side; ++i) {
                darkened += dest->GetPixels_zm24RGB(i % side, i / side).g < 255 ? 1 : 0;
            }
            EXPECT_GE(darkened, 1) << side << ", " << position;
            EXPECT_LE(darkened, 9) << side << ", " << position;
        }
    }
}

TEST(Render, ShrunkBitsAreTheShareOfWhite) {
    TZmBitmap source(8, 8, zm1g);
    source.Fill(1.0);
    for (std::int32_t x = 0; x < 8; ++x) {
        source.SetPixels_zm1g(x, 4, false);
    }
    auto dest = MakeFilled(4, 4, TRGB{});
    source.DrawToTZmBitmap(dest.get(), TRect{0, 0, 4, 4}, TRect{0, 0, 8, 8}, rfLanczos3);
    // Row 2 stands for the rows 4 - 1 to 4 + 1, of which one is black.
    EXPECT_EQ(170, dest->GetPixels_zm24RGB(1, 2).g);
    EXPECT_EQ(255, dest->GetPixels_zm24RGB(1, 1).g);
}

TEST(Render, ScalesEveryFormatByEveryFilter) {
    for (const TZmPixelFormat format : test::kAllFormats) {
        auto source = MakeNoise(format, 11, 9, 3);
        source->Fill(TRGBA{255, 255, 255, 255});
        if (format == zm8p) {
            source->SetGrayPalette();
            source->Fill(255.0);
        }
        for (int filter = rfNone; filter < kResampleFilterCount; ++filter) {
            for (const TRect& rect : {TRect{-3, -2, 4, 3}, TRect{1, 1, 27, 23},
                                      TRect{-20, 2, 40, 5}, TRect{3, -9, 5, 30}}) {
                auto dest = MakeFilled(24, 20, TRGB{});
                source->DrawToTZmBitmap(dest.get(), rect, TRect{0, 0, 11, 9},
                                        static_cast<TResampleFilter>(filter));
                const TRGB color = dest->GetPixels_zm24RGB(3, 2);
                ASSERT_EQ(kWhite, color) << PixelFormatInfo(format).name << ", filter " << filter
                                         << ", from " << rect.left << ", " << rect.top;
            }
        }
    }
}

TEST(Render, ScalesAdjustedColors) {
    TZmBitmap source(16, 16, zm32f);
    source.Fill(0.5);
    source.SetBlackValue(0.25);
    source.SetWhiteValue(0.75);
    auto dest = MakeFilled(8, 8, TRGB{});
    source.DrawToTZmBitmap(dest.get(), TRect{0, 0, 8, 8}, TRect{0, 0, 16, 16}, rfBilinear);
    EXPECT_EQ((TRGB{127, 127, 127}), dest->GetPixels_zm24RGB(4, 4));
    auto colors = MakeFilled(16, 16, TRGB{100, 100, 100});
    colors->SetContrast(10);
    colors->DrawToTZmBitmap(dest.get(), TRect{0, 0, 8, 8}, TRect{0, 0, 16, 16}, rfBilinear);
    EXPECT_EQ((TRGB{72, 72, 72}), dest->GetPixels_zm24RGB(4, 4));
}

// Scaled copies between formats.

TEST(StretchRect, KeepsTheDepthOfEqualFormats) {
    TZmBitmap source(4, 4, zm16g);
    source.Fill(0.0);
    source.SetPixels_zm16g(1, 1, 0x1234);
    TZmBitmap dest(8, 8, zm16g);
    dest.Fill(7.0);
    source.StretchRectTo(&dest, 2, 2, 4, 4, 1, 1, 2, 2, rfNone, 255, 1.0);
    EXPECT_EQ(0x1234, dest.GetPixels_zm16g(3, 3));
    EXPECT_EQ(0, dest.GetPixels_zm16g(4, 3));
    EXPECT_EQ(7, dest.GetPixels_zm16g(6, 3));
}

TEST(StretchRect, MixesAndConvertsByWayOfColors) {
    auto source = MakeFilled(4, 4, kWhite);
    source->AlphaFill(0);  // takes no part
    TZmBitmap dest(6, 6, zm8g);
    dest.Fill(0.0);
    source->StretchRectTo(&dest, -1, 1, 3, 3, 0, 0, 4, 4, rfBilinear, 255, 1.0);
    EXPECT_EQ(255, dest.GetPixels_zm8(1, 1));
    EXPECT_EQ(0, dest.GetPixels_zm8(2, 1));
    source->StretchRectTo(&dest, 3, 1, 2, 2, 0, 0, 4, 4, rfNone, 255, 0.5);
    EXPECT_EQ(62, dest.GetPixels_zm8(3, 1));
    auto colors = MakeFilled(6, 6, TRGB{});
    source->StretchRectTo(colors.get(), 0, 0, 6, 6, 0, 0, 4, 4, rfNone, 128, 1.0);
    EXPECT_EQ(127, colors->GetPixels_zm24RGB(5, 5).g);
    source->StretchRectTo(nullptr, 0, 0, 6, 6, 0, 0, 4, 4, rfNone, 128, 1.0);
}

// Canvases.

TEST(RenderToCanvas, MixesByAlphaAndLeavesWhatLiesOutside) {
    TBitmap bitmap;
    ASSERT_TRUE(bitmap.SetSize(6, 4, pf24bit));
    TBitmapCanvas canvas(bitmap);
    auto source = MakeFilled(4, 2, kWhite);
    source->AlphaFill(128);
    source->DrawToCanvasWithAlpha(&canvas, 4, -1, 255, 1.0);
    EXPECT_EQ(127, bitmap.GetScanLine(0)[4 * 3]);
    EXPECT_EQ(0, bitmap.GetScanLine(0)[3 * 3]);
    EXPECT_EQ(0, bitmap.GetScanLine(1)[5 * 3]);
    source->DrawToCanvas(&canvas, 1, 2);  // as the device draws: without alpha
    EXPECT_EQ(255, bitmap.GetScanLine(3)[4 * 3]);
    source->RenderToCanvasWithAlpha(&canvas, 0, 0, -1, 5, 0, 0, 4, 2, 255, rfNone, zmlNormal, 1);
    source->DrawToCanvas(nullptr, 0, 0);
}

TEST(RenderToCanvas, KeepsProportionsAndFillsTheRest) {
    TBitmap bitmap;
    ASSERT_TRUE(bitmap.SetSize(10, 6, pf24bit));
    TBitmapCanvas canvas(bitmap);
    auto source = MakeFilled(4, 4, TRGB{64, 64, 64});
    for (const TResampleFilter filter : {rfNone, rfBilinear}) {
        source->RenderToCanvas(&canvas, 1, 0, 8, 6, filter, 1.0, 0x00FF0000, true);
        const std::uint8_t* const row = bitmap.GetScanLine(5);
        EXPECT_EQ(0, row[0]);
        EXPECT_EQ(255, row[1 * 3]);  // blue: 8 - 6 = 2, one column to each side
        EXPECT_EQ(0, row[1 * 3 + 1]);
        EXPECT_EQ(64, row[2 * 3 + 1]);
        EXPECT_EQ(64, row[7 * 3 + 1]);
        EXPECT_EQ(0, row[8 * 3 + 1]);
    }
    source->RenderToCanvas(&canvas, 0, 0, 10, 6, rfBilinear, 2.0, 0, false);
    EXPECT_EQ(128, bitmap.GetScanLine(5)[9 * 3]);  // the root of 64 / 255, times 255
    source->RenderToCanvas(&canvas, 0, 0, 10, 6, rfBilinear, 0.0, 0, false);
    EXPECT_EQ(64, bitmap.GetScanLine(5)[9 * 3]);
}

TEST(RenderToCanvas, StripsJoinWithoutASeam) {
    TBitmap bitmap;
    ASSERT_TRUE(bitmap.SetSize(2000, 1500, pf24bit));  // three strips
    TBitmapCanvas canvas(bitmap);
    auto source = MakeMap(200, 150);
    source->RenderToCanvas(&canvas, 0, 0, 2000, 1500, rfBilinear, 1.0, 0, false);
    for (std::int32_t y = 1; y < 1500; ++y) {
        const int step = bitmap.GetScanLine(y)[1] - bitmap.GetScanLine(y - 1)[1];
        ASSERT_TRUE(step >= -1 && step <= 1) << y << ": " << step;
        ASSERT_NEAR(y / 10.0, bitmap.GetScanLine(y)[1], 2.0) << y;
    }
}

// Hostile arguments.

/// A coordinate: mostly near the pictures, sometimes far from them.
std::int32_t AnyCoordinate(std::minstd_rand& random) {
    constexpr std::int32_t kFar[] = {
        std::numeric_limits<std::int32_t>::min(), -2147483647, -65536, 65537, 2147483646,
        std::numeric_limits<std::int32_t>::max()};
    const auto kind = random() % 12;
    return kind < 6    ? static_cast<std::int32_t>(random() % 60) - 20
           : kind < 11 ? static_cast<std::int32_t>(random() % 20)
                       : kFar[random() % 6];
}

std::int32_t AnyTransparency(std::minstd_rand& random) {
    return random() % 9 == 0 ? AnyCoordinate(random) : static_cast<std::int32_t>(random() % 300);
}

/// A picture of a format that has, now and then, a plane of its own or another size.
std::unique_ptr<TZmBitmap> MakeAnyPicture(std::minstd_rand& random, TZmPixelFormat format) {
    auto picture = MakeNoise(format, 1 + static_cast<std::int32_t>(random() % 20),
                             1 + static_cast<std::int32_t>(random() % 20), 1);
    if (random() % 2 == 0) {
        const auto width = static_cast<std::int32_t>(random() % 25);
        picture->ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(width, 9, zmMemory));
        picture->GetAlphaChannel()->SetFull(random() % 4 == 0);
    }
    return picture;
}

/// Nothing to expect but that memory stays whole, which the builds with sanitizers watch.
TEST(RenderAnything, NeverLeavesTheRows) {
    std::minstd_rand random(20);
    for (int round = 0; round < 3000; ++round) {
        auto source = MakeAnyPicture(random, test::kAllFormats[random() % 10]);
        auto dest =
            MakeAnyPicture(random, random() % 4 == 0 ? test::kAllFormats[random() % 10] : zm24RGB);
        std::array<std::int32_t, 8> at{};
        for (std::int32_t& coordinate : at) {
            coordinate = AnyCoordinate(random);
        }
        const auto filter = static_cast<TResampleFilter>(
            random() % 2 == 0 ? std::uint8_t{rfNone} : random() % kResampleFilterCount);
        TZmBitmap& from = random() % 5 == 0 ? *dest : *source;
        const TRect update{AnyCoordinate(random), AnyCoordinate(random), AnyCoordinate(random),
                           AnyCoordinate(random)};
        TZmLookupTable columns(random() % 30, AnyCoordinate(random));
        from.RenderToTZmBitmap(
            dest.get(), &columns, nullptr, random() % 3 == 0 ? &update : nullptr, at[0], at[1],
            at[2], at[3], at[4], at[5], at[6], at[7], random() % 2 == 0, random() % 2 == 0,
            AnyTransparency(random), filter, random() % 2 == 0,
            static_cast<TZmRenderOperation>(random() % 50), AnyCoordinate(random) / 10.0);
        from.StretchRectTo(dest.get(), at[0], at[1], at[2], at[3], at[4], at[5], at[6], at[7],
                           filter, AnyTransparency(random), AnyCoordinate(random) / 10.0);
    }
}

}  // namespace
}  // namespace zm
