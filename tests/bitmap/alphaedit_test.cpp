#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();

std::vector<int> AlphaRow(TZmBitmap& bitmap, std::int32_t y) {
    std::vector<int> values;
    for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
        values.push_back(bitmap.GetAlpha(x, y));
    }
    return values;
}

void SetAlphaRow(TZmBitmap& bitmap, std::int32_t y, const std::vector<int>& values) {
    for (std::size_t x = 0; x < values.size(); ++x) {
        bitmap.SetAlpha(static_cast<std::int32_t>(x), y, static_cast<std::uint8_t>(values[x]));
    }
}

TEST(AlphaFillRect, FillsInsideAndKeepsTheMarkTrue) {
    TZmBitmap bitmap(5, 3, zm1g);
    bitmap.AlphaFillRect(1, 1, 3, 1, 40);
    EXPECT_EQ(AlphaRow(bitmap, 0), std::vector<int>(5, 255));
    EXPECT_EQ(AlphaRow(bitmap, 1), (std::vector<int>{255, 40, 40, 40, 255}));
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.AlphaFillRect(kMin, kMin, kMax, kMax, 255);
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.AlphaFillRect(4, 2, 9, 9, 255);
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.AlphaFillRect(4, 2, 9, 9, 254);
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.AlphaFillRect(3, 2, 2, 2, 0);
    EXPECT_EQ(AlphaRow(bitmap, 2), (std::vector<int>{255, 255, 255, 255, 254}));
    bitmap.GetAlphaChannelRaw()->AlphaFillRect(0, 0, 4, 2, 1);  // a plane has none
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 255);
}

TEST(AlphaFillRect, DrawsGradients) {
    TZmBitmap bitmap(6, 2, zm24RGB);
    bitmap.AlphaFillRect(1, 0, 5, 0, 0, 255, zmgHorizontal);
    // 255 / 4 = 63.75, 127.5 (to even), 191.25
    EXPECT_EQ(AlphaRow(bitmap, 0), (std::vector<int>{255, 0, 64, 128, 191, 255}));
    EXPECT_EQ(AlphaRow(bitmap, 1), std::vector<int>(6, 255));
    bitmap.AlphaFillRect(0, 0, 5, 1, 999, -7, zmgVertical);
    EXPECT_EQ(AlphaRow(bitmap, 0), std::vector<int>(6, 255));
    EXPECT_EQ(AlphaRow(bitmap, 1), std::vector<int>(6, 0));
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
}

TEST(MergeAlphaRectTo, AddsSubtractsAndSetsAtARate) {
    struct TCase {
        TZmAlphaMergeMode mode;
        double rate;
        std::uint8_t source, dest, result;
    };
    const TCase kCases[] = {
        {zmaAdd, 0.5, 101, 100, 150},  // 150.5, to even
        {zmaAdd, 0.5, 101, 101, 152},  // 151.5, to even
        {zmaAdd, 1.0, 200, 100, 255},
        {zmaAdd, -1.0, 30, 100, 70},
        {zmaAdd, 1e300, 1, 0, 255},
        {zmaSubtract, 1.0, 200, 100, 0},
        {zmaSubtract, 0.25, 10, 100, 98},  // 97.5, to even
        {zmaSubtract, 0.25, 11, 100, 97},  // 97.25
        {zmaSet, 1.0, 77, 100, 77},
        {zmaSet, 0.5, 101, 9, 50},  // 50.5, to even
        {zmaSet, 3.0, 101, 9, 255},
        {zmaSet, std::numeric_limits<double>::quiet_NaN(), 101, 9, 9},
    };
    for (const TCase& test : kCases) {
        TZmBitmap source(1, 1, zm24RGB);
        TZmBitmap dest(1, 1, zm8g);
        source.AlphaFill(test.source);
        dest.AlphaFill(test.dest);
        source.MergeAlphaRectTo(&dest, 0, 0, 0, 0, 1, 1, test.mode, test.rate);
        EXPECT_EQ(dest.GetAlpha(0, 0), test.result) << test.rate;
        TZmBitmap plane(1, 1, zm8g);
        plane.AlphaFill(test.dest);
        source.GetAlphaChannelRaw()->MergeAlphaRectTo(plane.GetAlphaChannelRaw(), 0, 0, 0, 0, 1, 1,
                                                      test.mode, test.rate);
        EXPECT_EQ(plane.GetAlpha(0, 0), test.result);
    }
}

TEST(MergeAlphaRectTo, ClipsAndCountsAMissingPlaneAsOpaque) {
    TZmBitmap source(4, 1, zm24RGB);
    TZmBitmap dest(5, 1, zm24RGB);
    SetAlphaRow(source, 0, {10, 20, 30, 40});
    dest.AlphaFill(0);
    source.MergeAlphaRectTo(&dest, 1, 0, -1, 0, 9, 9, zmaSet, 1.0);
    EXPECT_EQ(AlphaRow(dest, 0), (std::vector<int>{30, 40, 0, 0, 0}));
    source.MergeAlphaRectTo(&dest, kMin, 0, kMin, kMax, kMax, kMax, zmaSet, 1.0);
    source.MergeAlphaRectTo(&dest, 0, 0, 3, 0, kMax, kMax, zmaSet, 1.0);
    EXPECT_EQ(AlphaRow(dest, 0), (std::vector<int>{30, 40, 0, 10, 20}));
    source.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(2, 1, zmMemory));
    source.AlphaFill(7);
    source.MergeAlphaRectTo(&dest, 0, 0, 0, 0, 4, 1, zmaSet, 1.0);
    EXPECT_EQ(AlphaRow(dest, 0), (std::vector<int>{7, 7, 255, 255, 20}));
    source.RemoveAlphaChannel(false, 0);
    source.MergeAlphaRectTo(&dest, 0, 0, 0, 0, 4, 1, zmaAdd, 1.0);
    source.MergeAlphaRectTo(&dest, 0, 0, 1, 0, 4, 1, zmaAdd, 1.0);
    EXPECT_EQ(AlphaRow(dest, 0), std::vector<int>(5, 255));
    EXPECT_TRUE(dest.GetAlphaChannelRaw()->GetFull());
}

TEST(MergeAlphaRectTo, WithinOnePlaneTakesRowsBeforeTheyChange) {
    TZmBitmap bitmap(1, 4, zm8g);
    for (std::int32_t y = 0; y < 4; ++y) {
        bitmap.SetAlpha(0, y, static_cast<std::uint8_t>(10 * y));
    }
    bitmap.MergeAlphaRectTo(&bitmap, 0, 0, 0, 1, 1, 3, zmaSet, 1.0);
    EXPECT_EQ(bitmap.GetAlpha(0, 1), 0);
    EXPECT_EQ(bitmap.GetAlpha(0, 2), 10);
    EXPECT_EQ(bitmap.GetAlpha(0, 3), 20);
}

TEST(FeatherAlphaEdges, FadesAlongARow) {
    for (const bool quick : {false, true}) {
        TZmBitmap bitmap(9, 1, zm24RGB);
        SetAlphaRow(bitmap, 0, {200, 200, 0, 200, 200, 200, 200, 255, 255});
        bitmap.FeatherAlphaEdges(3, quick);
        EXPECT_EQ(AlphaRow(bitmap, 0), (std::vector<int>{100, 50, 0, 50, 100, 150, 200, 255, 255}));
        bitmap.AlphaFill(90);
        bitmap.FeatherAlphaEdges(5, quick);  // nothing is transparent
        EXPECT_EQ(AlphaRow(bitmap, 0), std::vector<int>(9, 90));
        SetAlphaRow(bitmap, 0, {0, 90});
        bitmap.FeatherAlphaEdges(0, quick);
        bitmap.FeatherAlphaEdges(kMin, quick);
        EXPECT_EQ(bitmap.GetAlpha(1, 0), 90);
        bitmap.FeatherAlphaEdges(kMax, quick);
        EXPECT_EQ(bitmap.GetAlpha(1, 0), 0);  // 90 / 65534
        TZmBitmap plain(2, 2, zm24RGB);
        plain.FeatherAlphaEdges(2, quick);
        EXPECT_FALSE(plain.HasAlphaChannel());
    }
}

TEST(FeatherAlphaEdges, CountsStraightWaysOrSteps) {
    TZmBitmap straight(5, 5, zm24RGB);
    straight.AlphaFill(200);
    straight.SetAlpha(0, 0, 0);
    TZmBitmap quick(straight);
    straight.FeatherAlphaEdges(3, false);
    quick.FeatherAlphaEdges(3, true);
    EXPECT_EQ(straight.GetAlpha(1, 1), 71);   // 200 * 1.41421 / 4 = 70.7
    EXPECT_EQ(straight.GetAlpha(2, 1), 112);  // 200 * 2.23607 / 4 = 111.8
    EXPECT_EQ(straight.GetAlpha(3, 3), 200);  // 4.24 away
    EXPECT_EQ(quick.GetAlpha(1, 1), 50);
    EXPECT_EQ(quick.GetAlpha(2, 1), 100);
    EXPECT_EQ(quick.GetAlpha(3, 3), 150);
    EXPECT_EQ(quick.GetAlpha(4, 4), 200);
}

/// The rule looked up pixel by pixel.
std::uint8_t FeatheredPixel(TZmBitmap& plane, std::int32_t x, std::int32_t y, std::int32_t depth,
                            bool quick) {
    double nearest = depth + 1;
    for (std::int32_t other_y = 0; other_y < plane.GetHeight(); ++other_y) {
        for (std::int32_t other_x = 0; other_x < plane.GetWidth(); ++other_x) {
            if (plane.GetPixels_zm8(other_x, other_y) == 0) {
                const double dx = std::abs(x - other_x);
                const double dy = std::abs(y - other_y);
                nearest =
                    std::min(nearest, quick ? std::max(dx, dy) : std::sqrt(dx * dx + dy * dy));
            }
        }
    }
    return static_cast<std::uint8_t>(
        RoundHalfEven(plane.GetPixels_zm8(x, y) * nearest / (depth + 1)));
}

TEST(FeatherAlphaEdges, FindsTheNearestOfManyPixels) {
    for (const bool quick : {false, true}) {
        for (const std::int32_t depth : {1, 2, 5, 40}) {
            for (std::uint32_t seed = 1; seed <= 6; ++seed) {
                const auto plane = MakeNoise(zm8g, 31, 17, seed);
                // Few transparent pixels, so that ways are long: none to about 40.
                for (std::int32_t y = 0; y < 17; ++y) {
                    for (std::int32_t x = 0; x < 31; ++x) {
                        const int value = plane->GetPixels_zm8(x, y);
                        plane->SetPixels_zm8(x, y,
                                             value < static_cast<int>(seed * seed / 2)
                                                 ? std::uint8_t{0}
                                                 : static_cast<std::uint8_t>(value | 1));
                    }
                }
                TZmBitmap bitmap(31, 17, zm24RGB);
                bitmap.ReplaceAlphaChannel(std::make_unique<TZmBitmap>(*plane));
                bitmap.FeatherAlphaEdges(depth, quick);
                for (std::int32_t y = 0; y < 17; ++y) {
                    for (std::int32_t x = 0; x < 31; ++x) {
                        ASSERT_EQ(bitmap.GetAlpha(x, y), FeatheredPixel(*plane, x, y, depth, quick))
                            << x << ", " << y << " depth " << depth << " seed " << seed;
                    }
                }
            }
        }
    }
}

TEST(SetTransparentColors, MatchesAllChannelsInclusive) {
    TZmBitmap bitmap(6, 1, zm24RGB);
    const TRGB kColors[] = {{10, 20, 30}, {12, 22, 32}, {13, 22, 32},
                            {12, 23, 32}, {12, 22, 33}, {9, 21, 31}};
    for (std::int32_t x = 0; x < 6; ++x) {
        bitmap.SetPixels_zm24RGB(x, 0, kColors[x]);
    }
    bitmap.SetTransparentColors(TRGB{1, 1, 1}, TRGB{2, 2, 2}, 9);
    EXPECT_EQ(AlphaRow(bitmap, 0), std::vector<int>(6, 255));
    bitmap.AlphaFill(255);
    bitmap.SetTransparentColors(TRGB{10, 20, 30}, TRGB{12, 22, 32}, 40);
    EXPECT_EQ(AlphaRow(bitmap, 0), (std::vector<int>{40, 40, 255, 255, 255, 255}));
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
}

TEST(SetTransparentColors, LooksAtTheColoursOfAnyFormat) {
    for (const TZmPixelFormat format :
         {zm1g, zm8p, zm8g, zm16g, zm32f, zmCMYK, zm48RGB, zmCIELab, zm32RGB}) {
        TZmBitmap bitmap(12, 2, format);
        bitmap.SetPalette(5, TRGB{255, 255, 255});
        const TRGB white{255, 255, 255};
        bitmap.Fill(0.0);
        bitmap.SetPixels(9, 1, white);
        bitmap.SetTransparentColors(TRGB{250, 250, 250}, white, 0);
        for (std::int32_t x = 0; x < 12; ++x) {
            EXPECT_EQ(bitmap.GetAlpha(x, 1), x == 9 ? 0 : 255) << PixelFormatInfo(format).name;
        }
        bitmap.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(3, 1, zmMemory));
        bitmap.SetTransparentColors(TRGB{0, 0, 0}, white, 1);
        EXPECT_EQ(bitmap.GetAlpha(2, 0), 1);
        EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetWidth(), 3);
    }
}

TEST(SyncAlphaChannel, BringsThePlaneToTheImageSize) {
    TZmBitmap bitmap(4, 2, zm24RGB);
    bitmap.SyncAlphaChannel(false);
    ASSERT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlpha(3, 1), 255);
    auto plane = std::make_unique<TZmBitmap>(2, 1, zm8g);
    plane->SetPixels_zm8(0, 0, 10);
    plane->SetPixels_zm8(1, 0, 90);
    bitmap.ReplaceAlphaChannel(std::move(plane));
    bitmap.SyncAlphaChannel(false);
    EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetHeight(), 2);
    EXPECT_EQ(AlphaRow(bitmap, 1), (std::vector<int>{10, 10, 90, 90}));
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetIsAlpha());
    bitmap.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(9, 7, zmMemory));
    bitmap.SyncAlphaChannel(true);
    EXPECT_EQ(AlphaRow(bitmap, 0), std::vector<int>(4, 255));
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetFull());
    auto colors = std::make_unique<TZmBitmap>(4, 2, zm24RGB);
    colors->Fill(static_cast<double>(0x00323232));
    bitmap.ReplaceAlphaChannel(std::move(colors));
    bitmap.SyncAlphaChannel(true);
    EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetPixelFormat(), zm8g);
    EXPECT_EQ(AlphaRow(bitmap, 0), std::vector<int>(4, 50));
    bitmap.GetAlphaChannelRaw()->SyncAlphaChannel(true);
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->HasAlphaChannel());
}

}  // namespace
}  // namespace zm::test
