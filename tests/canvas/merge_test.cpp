// Pictures with an alpha byte laid over images: hand-worked values, every format, any position.
#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <memory>

#include "engine/bitmap/zmxBitmaps.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr double kWhole = 1.0;

std::unique_ptr<TZmBitmap> MakeOverlay(std::int32_t width, std::int32_t height, TRGBA value) {
    auto overlay = std::make_unique<TZmBitmap>(width, height, zm32RGB);
    overlay->Fill(value);
    return overlay;
}

/// One pixel of `upper` merged over one of `lower`.
TRGB MergeOne(TRGBA upper, TRGB lower, std::int32_t transparency = 255, double opacity = kWhole) {
    TZmBitmap image(1, 1, zm24RGB);
    image.SetPixels(0, 0, lower);
    image.MergeWithAlpha(MakeOverlay(1, 1, upper).get(), 0, 0, transparency, opacity);
    EXPECT_FALSE(image.HasAlphaChannel());
    return image.GetPixels(0, 0);
}

TEST(MergeTest, OverOpaquePixelsIsTheWeightedMeanRounded) {
    // (128 x 200 + 127 x 100) / 255 = 150.2; 128 / 255 = 0.50; 127 x 255 / 255 = 127
    EXPECT_EQ(MergeOne({200, 1, 0, 128}, {100, 0, 255}), (TRGB{150, 1, 127}));
    // 127 / 255 = 0.498; (127 x 1 + 128 x 2) / 255 = 1.502
    EXPECT_EQ(MergeOne({1, 1, 9, 127}, {0, 2, 9}), (TRGB{0, 2, 9}));
    EXPECT_EQ(MergeOne({10, 20, 30, 255}, {255, 0, 7}), (TRGB{10, 20, 30}));
    EXPECT_EQ(MergeOne({10, 20, 30, 0}, {255, 0, 7}), (TRGB{255, 0, 7}));
}

TEST(MergeTest, TheCeilingComesBeforeTheOpacity) {
    // min(200, 100) x 0.5 = 50: 50 x 255 / 255
    EXPECT_EQ(MergeOne({255, 0, 0, 200}, {0, 0, 0}, 100, 0.5), (TRGB{50, 0, 0}));
    // 255 x 0.5 = 127.5, truncated
    EXPECT_EQ(MergeOne({255, 0, 0, 255}, {0, 0, 0}, 255, 0.5), (TRGB{127, 0, 0}));
    // limited to their ranges
    EXPECT_EQ(MergeOne({255, 0, 0, 255}, {0, 0, 0}, 999, 7.0), (TRGB{255, 0, 0}));
    EXPECT_EQ(MergeOne({255, 0, 0, 255}, {0, 0, 0}, -1, kWhole), TRGB{});
    EXPECT_EQ(MergeOne({255, 0, 0, 255}, {0, 0, 0}, 255, -1.0), TRGB{});
    EXPECT_EQ(MergeOne({255, 0, 0, 255}, {0, 0, 0}, 255, std::numeric_limits<double>::quiet_NaN()),
              TRGB{});
}

TEST(MergeTest, OverAPlaneBothAlphasCount) {
    struct TCase {
        std::uint8_t upper, lower;  // alphas
        std::uint8_t color, alpha;  // of 200 over 100
    };
    const TCase cases[] = {
        {128, 0, 200, 128},    // its own colour over a transparent pixel
        {128, 128, 167, 192},  // 8153600 / 48896 = 166.75; 48896 / 255 = 191.75
        {51, 204, 124, 214},   // (255 x 51 x 200 + 204 x 204 x 100) / 54621 = 123.8; 54621 / 255
        {255, 10, 200, 255},  {0, 10, 100, 10},
        {128, 255, 150, 255}, {1, 1, 150, 2},  // (51000 + 25400) / 509 = 150.1; 509 / 255 = 1.996
    };
    for (const TZmPixelFormat format : {zm24RGB, zm32RGB, zm8g}) {
        for (const TCase& row : cases) {
            TZmBitmap image(3, 1, format);
            image.Fill(TRGBA{100, 100, 100, 77});
            image.AlphaFill(row.lower);
            image.MergeWithAlpha(MakeOverlay(1, 1, {200, 200, 200, row.upper}).get(), 1, 0, 255,
                                 kWhole);
            EXPECT_EQ(image.GetPixels(1, 0), (TRGB{row.color, row.color, row.color}))
                << int{row.upper} << " over " << int{row.lower} << " in format " << int{format};
            EXPECT_EQ(image.GetAlpha(1, 0), row.alpha);
            EXPECT_EQ(image.GetPixels(2, 0), (TRGB{100, 100, 100}));
            EXPECT_EQ(image.GetAlpha(2, 0), row.lower);
            if (format == zm32RGB) {
                EXPECT_EQ(image.GetPixels_zm32RGB(1, 0).a, 77);
            }
        }
    }
}

TEST(MergeTest, PixelsBeyondASmallerPlaneAreOpaque) {
    TZmBitmap image(3, 2, zm24RGB);
    image.Fill(0.0);
    image.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(2, 1, zmMemory));
    image.AlphaFill(0);
    image.MergeWithAlpha(MakeOverlay(3, 2, {200, 200, 200, 128}).get(), 0, 0, 255, kWhole);
    EXPECT_EQ(image.GetPixels(1, 0).b, 200);
    EXPECT_EQ(image.GetPixels(2, 0).b, 100);  // 128 x 200 / 255 = 100.4
    EXPECT_EQ(image.GetPixels(1, 1).b, 100);
}

TEST(MergeTest, FormatsChangeOnlyWhereSomethingCoversThem) {
    for (int ordinal = zm1g; ordinal <= zm32RGB; ++ordinal) {
        const auto format = static_cast<TZmPixelFormat>(ordinal);
        // Runs longer than any buffer, and single pixels between free ones.
        auto image = MakeNoise(format, 700, 2, 1);
        TZmBitmap before(*image);
        auto overlay = MakeOverlay(700, 2, {0, 0, 0, 0});
        for (std::int32_t x = 100; x < 650; ++x) {
            overlay->SetPixels_zm32RGB(x, 0, {255, 255, 255, 255});
        }
        overlay->SetPixels_zm32RGB(3, 1, {0, 0, 0, 255});
        image->MergeWithAlpha(overlay.get(), 0, 0, 255, kWhole);
        const auto expect = [&](std::int32_t x, std::int32_t y, TRGB color) {
            before.SetPixels(x, y, color);
            if (format == zm32RGB) {
                before.GetPPixels_zm32RGB(x, y)->a = image->GetPixels_zm32RGB(x, y).a;
            }
        };
        for (std::int32_t x = 100; x < 650; ++x) {
            expect(x, 0, {255, 255, 255});
        }
        expect(3, 1, {0, 0, 0});
        ExpectSamePixels(before, *image);
    }
}

TEST(MergeTest, FewColoursTakeTheNearest) {
    TZmBitmap bits(2, 1, zm1g);
    bits.Fill(0.0);
    auto overlay = MakeOverlay(2, 1, {255, 255, 255, 128});  // grey 128 of black sets the bit
    overlay->SetPixels_zm32RGB(1, 0, {255, 255, 255, 127});
    bits.MergeWithAlpha(overlay.get(), 0, 0, 255, kWhole);
    EXPECT_TRUE(bits.GetPixels_zm1g(0, 0));
    EXPECT_FALSE(bits.GetPixels_zm1g(1, 0));

    TZmBitmap indexed(2, 1, zm8p);
    indexed.SetPalette(1, {255, 255, 255});
    indexed.SetPalette(2, {0, 0, 140});
    indexed.SetPaletteUsed(3);
    indexed.Fill(0.0);
    overlay = MakeOverlay(2, 1, {0, 0, 255, 128});  // 128 red lies nearest 140, 60 nearest black
    overlay->SetPixels_zm32RGB(1, 0, {0, 0, 255, 60});
    indexed.MergeWithAlpha(overlay.get(), 0, 0, 255, kWhole);
    EXPECT_EQ(indexed.GetPixels_zm8(0, 0), 2);
    EXPECT_EQ(indexed.GetPixels_zm8(1, 0), 0);
}

TEST(MergeTest, AnyPositionIsClipped) {
    constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
    constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
    auto overlay = MakeNoise(zm32RGB, 5, 4, 3);
    for (const std::int32_t x : {kMin, -5, -4, -1, 0, 3, 5, 6, kMax}) {
        for (const std::int32_t y : {kMin, -4, -2, 0, 4, 5, kMax}) {
            auto image = MakeNoise(zm24RGB, 6, 5, 9);
            image->SetMinFileSize(0);
            image->SetLocation(x % 2 == 0 ? zmFile : zmMemory);
            AddNoiseAlpha(*image, 4);
            TZmBitmap expected(*image);
            for (std::int32_t i = 0; i < 6 * 5; ++i) {
                const std::int64_t from_x = std::int64_t{i % 6} - x;
                const std::int64_t from_y = std::int64_t{i / 6} - y;
                if (from_x >= 0 && from_x < 5 && from_y >= 0 && from_y < 4) {
                    const auto source = overlay->GetPixels_zm32RGB(
                        static_cast<std::int32_t>(from_x), static_cast<std::int32_t>(from_y));
                    expected.MergeWithAlpha(MakeOverlay(1, 1, source).get(), i % 6, i / 6, 255,
                                            kWhole);
                }
            }
            image->MergeWithAlpha(overlay.get(), x, y, 255, kWhole);
            ExpectSamePixels(expected, *image);
            ExpectSameAlpha(expected, *image);
        }
    }
}

TEST(MergeTest, WhatIsNoOverlayDoesNothing) {
    auto image = MakeNoise(zm24RGB, 6, 5, 9);
    TZmBitmap before(*image);
    TZmBitmap empty;
    auto other = MakeNoise(zm24RGB, 6, 5, 2);
    auto overlay = MakeNoise(zm32RGB, 6, 5, 2);
    image->MergeWithAlpha(nullptr, 0, 0, 255, kWhole);
    image->MergeWithAlpha(&empty, 0, 0, 255, kWhole);
    image->MergeWithAlpha(other.get(), 0, 0, 255, kWhole);
    empty.MergeWithAlpha(overlay.get(), 0, 0, 255, kWhole);
    ExpectSamePixels(before, *image);
    EXPECT_TRUE(empty.IsEmpty());
}

}  // namespace
}  // namespace zm::test
