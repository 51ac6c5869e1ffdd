// The area engine of rfBilinear and rfBicubic: values worked by hand, and the fast forms against
// the plain one.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/proc/zmresample.h"
#include "engine/proc/zmresample_p.h"
#include "tests/proc/resample_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr auto kLinear = TAreaInterpolation::kLinear;
constexpr auto kCubic = TAreaInterpolation::kCubic;

TMatrix Area(TZmPixelFormat format, const TMatrix& values, std::int32_t width, std::int32_t height,
             TAreaInterpolation interpolation) {
    const auto source = GrayPicture(format, values);
    const auto target = TargetFor(*source, width, height);
    EXPECT_TRUE(ResampleAreaPlain(*source, *target, nullptr, interpolation, kNobody));
    const auto again = TargetFor(*source, width, height);
    EXPECT_TRUE(ResampleArea(*source, *again, nullptr, interpolation, kNobody));
    EXPECT_EQ(ValuesOf(*target), ValuesOf(*again)) << "the fast form differs";
    return ValuesOf(*target);
}

struct TAreaCase {
    const char* name;
    TAreaInterpolation interpolation;
    TMatrix source;
    std::int32_t width;
    std::int32_t height;
    TMatrix expected;
};

const TMatrix kSquare{{0, 100}, {200, 60}};

TEST(ResampleAreaTest, HandWorkedValues) {
    const std::vector<TAreaCase> cases{
        // Both shrink, whole factor: means of 2x2; 223 / 4 = 55.75.
        {"means", kLinear, {{10, 20, 30, 41}, {50, 60, 70, 82}}, 2, 1, {{35, 56}}},
        // Means of 2.5 and 3.5: ties go to the even number.
        {"ties", kLinear, {{2, 3, 3, 4}, {2, 3, 3, 4}}, 2, 1, {{2, 4}}},
        // Factor 1.5: (0 + 45) / 1.5 and (45 + 180) / 1.5.
        {"fractions", kLinear, {{0, 90, 180}}, 2, 1, {{30, 150}}},
        // Both enlarge: a target pixel has the value at its far end, here at 0.5, 1, 1.5, 2. The
        // row above the edge: 50 100 | 100 100, the row below: 130 60 | 60 60.
        {"enlarge",
         kLinear,
         kSquare,
         4,
         4,
         {{90, 80, 80, 80}, {130, 60, 60, 60}, {130, 60, 60, 60}, {130, 60, 60, 60}}},
        // Only the width enlarges: the same row values, averaged over the two rows.
        {"wider", kLinear, kSquare, 4, 1, {{90, 80, 80, 80}}},
        // Only the height enlarges: (0+200)/2 and (100+60)/2 average to 90, then 200 and 60.
        {"higher", kLinear, kSquare, 1, 4, {{90}, {130}, {130}, {130}}},
        // A side that stays counts as shrinking: no interpolation along it.
        {"same width", kLinear, kSquare, 2, 4, {{100, 80}, {200, 60}, {200, 60}, {200, 60}}},
        {"one pixel", kLinear, {{77}}, 3, 2, {{77, 77, 77}, {77, 77, 77}}},
        // Four-point weights at 0.5: -0.125, 0.625, 0.625, -0.125; at 1 the right sample.
        // x=0: -0.125 * 200 is limited to 0. x=2: 0.5 * 200. x=4: 1.125 * 200.
        {"cubic wider", kCubic, {{0, 0, 200, 200}}, 8, 1, {{0, 0, 100, 200, 225, 200, 200, 200}}},
        // 1.125 * 250 is limited to 255.
        {"cubic limit", kCubic, {{0, 0, 250, 250}}, 8, 1, {{0, 0, 125, 250, 255, 250, 250, 250}}},
        {"cubic higher",
         kCubic,
         {{0}, {0}, {200}, {200}},
         1,
         8,
         {{0}, {0}, {100}, {200}, {225}, {200}, {200}, {200}}},
        // Both enlarge. The rows first, rounded: 0 0 2 3 3 3 3 3 (from 1.5 and 3.375) and
        // 0 0 4 9 10 9 9 9 (from 4.5 and 10.125). Then the columns: half of both; the second;
        // 1.125 times the second less 0.125 times the first; the second. Unrounded rows would
        // give 6.75, so 7, at x = 4 of the first row instead of the even neighbour of 6.5.
        {"cubic rounds rows",
         kCubic,
         {{0, 0, 3, 3}, {0, 0, 9, 9}},
         8,
         4,
         {{0, 0, 3, 6, 6, 6, 6, 6},
          {0, 0, 4, 9, 10, 9, 9, 9},
          {0, 0, 4, 10, 11, 10, 10, 10},
          {0, 0, 4, 9, 10, 9, 9, 9}}},
    };
    for (const TAreaCase& test : cases) {
        SCOPED_TRACE(test.name);
        EXPECT_EQ(Area(zm8g, test.source, test.width, test.height, test.interpolation),
                  test.expected);
    }
}

TEST(ResampleAreaTest, SixteenBitSamplesKeepTheirPrecision) {
    EXPECT_EQ(Area(zm16g, {{1000, 1001, 65535, 65534}}, 2, 1, kLinear), (TMatrix{{1000, 65534}}));
    EXPECT_EQ(Area(zm16g, {{0, 0, 60000, 60000}}, 8, 1, kCubic),
              (TMatrix{{0, 0, 30000, 60000, 65535, 60000, 60000, 60000}}));
}

TEST(ResampleAreaTest, ColoursDoNotBleedAcrossAlphaEdges) {
    // Opaque A beside transparent B. Columns 0 and 1 lie between A and B and take A, the pixel
    // whose alpha is above another's; columns 2 and 3 lie on B alone.
    const TRGB a{10, 20, 30};
    const TRGB b{200, 100, 50};
    TZmBitmap source(2, 1, zm24RGB);
    source.SetPixels_zm24RGB(0, 0, a);
    source.SetPixels_zm24RGB(1, 0, b);
    source.SetAlpha(0, 0, 255);
    source.SetAlpha(1, 0, 0);
    TZmBitmap target(4, 2, zm24RGB);
    ASSERT_TRUE(ResampleArea(source, target, source.GetAlphaChannel(), kLinear, kNobody));
    for (std::int32_t x = 0; x < 4; ++x) {
        EXPECT_EQ(target.GetPixels_zm24RGB(x, 0), x < 2 ? a : b) << x;
    }
    // Equal alpha blends: 0.5 of both.
    source.SetAlpha(1, 0, 255);
    ASSERT_TRUE(ResampleArea(source, target, source.GetAlphaChannel(), kLinear, kNobody));
    EXPECT_EQ(target.GetPixels_zm24RGB(0, 0), (TRGB{105, 60, 40}));
    EXPECT_EQ(target.GetPixels_zm24RGB(1, 0), b);
}

TEST(ResampleAreaTest, LastOfTheStrongerAlphasWins) {
    // Alphas 9 5 / 7 5 at the corner: the last above another is the third, below left.
    TZmBitmap source(2, 2, zm24RGB);
    const std::array<std::uint8_t, 4> alphas{9, 5, 7, 5};
    for (std::int32_t i = 0; i < 4; ++i) {
        const auto value = static_cast<std::uint8_t>(50 * i);
        source.SetPixels_zm24RGB(i % 2, i / 2, TRGB{value, value, value});
        source.SetAlpha(i % 2, i / 2, alphas[static_cast<std::size_t>(i)]);
    }
    TZmBitmap target(4, 4, zm24RGB);
    ASSERT_TRUE(ResampleArea(source, target, source.GetAlphaChannel(), kLinear, kNobody));
    EXPECT_EQ(target.GetPixels_zm24RGB(0, 0).r, 100);
}

TEST(ResampleAreaTest, FourChannelsEnlargedLinearlyKeepTheFirstAlone) {
    TZmBitmap source(2, 2, zm32RGB);
    source.Fill(TRGBA{40, 80, 120, 160});
    TZmBitmap target(4, 4, zm32RGB);
    ASSERT_TRUE(ResampleArea(source, target, nullptr, kLinear, kNobody));
    EXPECT_EQ(target.GetPixels_zm32RGB(3, 3), (TRGBA{40, 0, 0, 0}));
    ASSERT_TRUE(ResampleArea(source, target, nullptr, kCubic, kNobody));
    EXPECT_EQ(target.GetPixels_zm32RGB(3, 3), (TRGBA{40, 80, 120, 160}));
    TZmBitmap wider(4, 2, zm32RGB);
    ASSERT_TRUE(ResampleArea(source, wider, nullptr, kLinear, kNobody));
    EXPECT_EQ(wider.GetPixels_zm32RGB(3, 1), (TRGBA{40, 80, 120, 160}));
}

// The fast forms.

constexpr TZmPixelFormat kAreaFormats[] = {zm8g, zm24RGB, zm32RGB, zm16g, zm48RGB};

void CompareFastWithPlain(TZmPixelFormat format, TZmImageSize from, TZmImageSize to,
                          TContent content, TAreaInterpolation interpolation,
                          TZmBitmap* alpha = nullptr) {
    SCOPED_TRACE(testing::Message()
                 << PixelFormatInfo(format).name << ' ' << from.width << 'x' << from.height
                 << " to " << to.width << 'x' << to.height << " content " << int{content}
                 << " interpolation " << static_cast<int>(interpolation));
    // Odd addresses, but for words.
    const std::size_t mask = format == zm16g || format == zm48RGB ? 6 : 7;
    const auto offset = static_cast<std::size_t>(from.width + to.height) % 7;
    TGuardedPicture source(format, from.width, from.height, offset & mask);
    FillContent(source.Bitmap(), content, static_cast<std::uint32_t>(from.width * 7 + to.width));
    TZmBitmap plain(to.width, to.height, format);
    ASSERT_TRUE(ResampleAreaPlain(source.Bitmap(), plain, alpha, interpolation, kNobody));
    ForSomeInstructionSets(from.width, [&] {
        TGuardedPicture fast(format, to.width, to.height, (offset * 3 + 1) % 7 & mask);
        ASSERT_TRUE(HasFastArea(source.Bitmap(), fast.Bitmap(), interpolation));
        ASSERT_TRUE(
            ResampleAreaFast(source.Bitmap(), fast.Bitmap(), alpha, interpolation, kNobody));
        ExpectSamePixels(plain, fast.Bitmap());
        fast.ExpectGuardsIntact();
    });
    source.ExpectGuardsIntact();
}

/// All formats and both filters, but for the one combination that has no fast form.
void CompareAllFormats(TZmImageSize from, TZmImageSize to, TContent content) {
    for (const TZmPixelFormat format : kAreaFormats) {
        for (const TAreaInterpolation interpolation : {kLinear, kCubic}) {
            if (format != zm32RGB || interpolation == kCubic || to.width <= from.width ||
                to.height <= from.height) {
                CompareFastWithPlain(format, from, to, content, interpolation);
            }
        }
    }
}

TEST(ResampleAreaFastTest, EqualsThePlainFormAtAllWidths) {
    for (std::int32_t width = 1; width <= 70; ++width) {
        const std::int32_t height = 1 + width * 5 % 17;
        const std::int32_t less = 2 + width % 3;
        const std::int32_t more = 1 + width % 6;
        const std::int32_t smaller_width = std::max(width * 2 / (less * 2 - 1), 1);
        const std::int32_t smaller_height = std::max(height / less, 1);
        const TZmImageSize larger{width * more + width % 5 + 1, height * more + width % 3 + 1};
        for (const TZmImageSize to :
             {TZmImageSize{smaller_width, smaller_height}, TZmImageSize{smaller_width, height},
              larger, TZmImageSize{larger.width, smaller_height},
              TZmImageSize{smaller_width, larger.height}, TZmImageSize{width, larger.height}}) {
            CompareAllFormats({width, height}, to, static_cast<TContent>(width % kContentCount));
            ASSERT_FALSE(testing::Test::HasFailure());
        }
    }
}

TEST(ResampleAreaFastTest, EqualsThePlainFormOnWholeAndTiedRatios) {
    struct TRatio {
        TZmImageSize from;
        TZmImageSize to;
    };
    const std::vector<TRatio> ratios{
        {{64, 48}, {16, 12}}, {{64, 48}, {32, 24}}, {{60, 60}, {20, 12}}, {{125, 125}, {32, 32}},
        {{16, 12}, {64, 48}}, {{16, 12}, {32, 36}}, {{20, 30}, {30, 45}}, {{1, 1}, {65, 66}},
        {{65, 3}, {1, 1}},    {{2, 2}, {70, 3}},    {{3, 2}, {20011, 5}}, {{20011, 5}, {3, 2}},
        {{300, 2}, {299, 1}}, {{299, 2}, {300, 3}}, {{1, 70}, {2, 71}},   {{700, 700}, {7, 7}},
        {{2, 1}, {65535, 2}}, {{65535, 2}, {1, 1}}, {{48, 36}, {64, 48}}, {{64, 8}, {1024, 80}},
        {{65535, 2}, {1, 3}}, {{2, 300}, {999, 1}}, {{64, 48}, {16, 96}}, {{60, 60}, {90, 20}},
    };
    for (const TRatio& ratio : ratios) {
        for (int content = 0; content < kContentCount; ++content) {
            CompareAllFormats(ratio.from, ratio.to, static_cast<TContent>(content));
        }
    }
}

/// Planes with large areas and with steps everywhere.
TEST(ResampleAreaFastTest, EqualsThePlainFormAtAlphaEdges) {
    for (std::int32_t width = 1; width <= 33; ++width) {
        const std::int32_t height = 1 + width * 7 % 13;
        for (const std::int32_t levels : {2, 200}) {
            const auto alpha = TZmBitmap::CreateAsAlphaChannel(width, height, zmMemory);
            for (std::int32_t i = 0; i < width * height; i += 1 + i % 5) {
                alpha->SetPixels_zm8(i % width, i / width,
                                     static_cast<std::uint8_t>(255 - i * 37 % levels));
            }
            const TZmImageSize to{width * 2 + width % 3 + 1, height * 3 + width % 2 + 1};
            CompareFastWithPlain(zm24RGB, {width, height}, to, kNoiseContent, kLinear, alpha.get());
            CompareFastWithPlain(zm24RGB, {width, height}, {width * 4, height * 4}, kTwoLevels,
                                 kLinear, alpha.get());
            ASSERT_FALSE(testing::Test::HasFailure());
        }
    }
}

TEST(ResampleAreaTest, ProgressCountsEveryRow) {
    const auto source = MakeNoise(zm24RGB, 8, 8, 3);
    TZmBitmap target(4, 3, zm24RGB);
    std::vector<std::int32_t> percents;
    const TResampleListener listener{&percents, [&](void* sender, std::int32_t percent) {
                                         EXPECT_EQ(sender, &percents);
                                         percents.push_back(percent);
                                     }};
    ASSERT_TRUE(ResampleAreaPlain(*source, target, nullptr, kLinear, listener));
    EXPECT_EQ(percents, (std::vector<std::int32_t>{33, 66, 100}));
    percents.clear();
    ASSERT_TRUE(ResampleArea(*source, target, nullptr, kLinear, listener));
    EXPECT_EQ(percents, (std::vector<std::int32_t>{33, 66, 100}));
}

}  // namespace
}  // namespace zm::test
