// Nearest copy, Fast linear, Kernel, Projection, 1-bit reduction and the scaler: values worked
// by hand on small pictures.

#include <gtest/gtest.h>

#include <set>
#include <thread>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/proc/zmresample_p.h"
#include "tests/proc/resample_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

struct TEngineCase {
    const char* name;
    TMatrix source;
    std::int32_t width;
    std::int32_t height;
    TMatrix expected;
};

// Nearest copy.

TEST(ResampleNearestTest, CopiesSamplesOfEveryFormat) {
    for (int format = zm1g; format <= zm32RGB; ++format) {
        SCOPED_TRACE(PixelFormatInfo(static_cast<TZmPixelFormat>(format)).name);
        const auto source = MakeNoise(static_cast<TZmPixelFormat>(format), 19, 5, 7);
        for (const auto& [width, height] : {std::pair{50, 3}, std::pair{9, 11}, {1, 1}, {19, 7}}) {
            const auto target = TargetFor(*source, width, height);
            ASSERT_TRUE(ResampleNearest(*source, *target));
            for (std::int32_t y = 0; y < height; ++y) {
                for (std::int32_t x = 0; x < width; ++x) {
                    // Whole numbers here: Trunc(x * (sw / dw)) has no rounding trouble at these
                    // sizes.
                    const std::int32_t column = x * 19 / width;
                    const std::int32_t row = y * 5 / height;
                    for (std::int32_t c = 0; c < source->GetChannelCount(); ++c) {
                        ASSERT_EQ(ChannelValue(*target, x, y, c),
                                  ChannelValue(*source, column, row, c))
                            << x << ',' << y;
                    }
                }
            }
            EXPECT_EQ(target->GetPaletteArray(), source->GetPaletteArray());
        }
    }
}

TEST(ResampleNearestTest, RestoresTheDataAccess) {
    const auto source = MakeNoise(zm8g, 4, 4, 1);
    const auto target = TargetFor(*source, 8, 8);
    source->SetAccess(zmdReadWrite);
    target->SetAccess(zmdRead);
    ASSERT_TRUE(ResampleNearest(*source, *target));
    EXPECT_EQ(source->fAccess, zmdReadWrite);
    EXPECT_EQ(target->fAccess, zmdRead);
}

// Fast linear.

const std::vector<TEngineCase> kFastLinearCases{
    // Positions 0 .5 1 1.5 2 2.5 3 3.5; the left sample is rounded, ties to even: 0 0 1 2 2 2 3 3.
    // x=3: 200 + (40 - 200) * -0.5 = 280, limited. x=7: both neighbours are the last sample.
    {"extrapolates", {{0, 100, 200, 40}}, 8, 1, {{0, 50, 100, 255, 200, 120, 40, 40}}},
    // x=0: columns 0 to Round(2); x=1: columns Round(2) to Round(min(2, 1) / 0.5) = 2.
    {"means", {{10, 20, 60, 99}}, 2, 1, {{30, 60}}},
    {"mean is truncated", {{10, 20, 61, 99}}, 2, 1, {{30, 61}}},
    {"means of rows", {{10}, {20}, {60}, {99}}, 1, 2, {{30}, {60}}},
    // Rows truncate: positions 0 .5 1 1.5; below the last row is the last row.
    {"rows", {{0}, {100}}, 1, 4, {{0}, {50}, {100}, {100}}},
    // The plane between the passes is not limited: (280 + 100 + 100) / 3 = 160 at x = 3.
    {"unlimited plane",
     {{0, 100, 200, 40}, {0, 100, 100, 100}, {0, 100, 100, 100}, {0, 0, 0, 0}},
     8,
     2,
     {{0, 50, 100, 160, 133, 106, 80, 80}, {0, 50, 100, 100, 100, 100, 100, 100}}},
    // A width that stays is still averaged with the next column: left 0 1 2, right 1 2 2.
    {"same width", {{10, 20, 40}, {10, 20, 40}}, 3, 1, {{15, 30, 40}}},
    {"one pixel", {{9}}, 3, 2, {{9, 9, 9}, {9, 9, 9}}},
};

TEST(ResampleFastLinearTest, HandWorkedValues) {
    for (const TEngineCase& test : kFastLinearCases) {
        SCOPED_TRACE(test.name);
        const auto gray = GrayPicture(zm8g, test.source);
        const auto gray_target = TargetFor(*gray, test.width, test.height);
        ASSERT_TRUE(ResampleFastLinear(*gray, *gray_target, nullptr, kNobody));
        EXPECT_EQ(ValuesOf(*gray_target), test.expected);
        const auto color = ColorPicture(test.source);
        const auto color_target = TargetFor(*color, test.width, test.height);
        ASSERT_TRUE(ResampleFastLinear(*color, *color_target, nullptr, kNobody));
        EXPECT_EQ(ValuesOf(*color_target), test.expected);
    }
}

TEST(ResampleFastLinearTest, SixteenBitsLimitAt65535) {
    const auto source = GrayPicture(zm16g, {{0, 30000, 60000, 10}});
    const auto target = TargetFor(*source, 8, 1);
    ASSERT_TRUE(ResampleFastLinear(*source, *target, nullptr, kNobody));
    EXPECT_EQ(ValuesOf(*target), (TMatrix{{0, 15000, 30000, 65535, 60000, 30005, 10, 10}}));
}

TEST(ResampleFastLinearTest, RectangleIsInclusiveAndLimited) {
    const auto source = MakeNoise(zm24RGB, 6, 5, 11);
    const auto whole = TargetFor(*source, 9, 8);
    ASSERT_TRUE(ResampleFastLinear(*source, *whole, nullptr, kNobody));
    struct TRectCase {
        TRect asked;
        TRect computed;
    };
    for (const TRectCase& test :
         {TRectCase{{2, 1, 4, 3}, {2, 1, 4, 3}}, TRectCase{{-5, 6, 2, 99}, {0, 6, 2, 7}},
          TRectCase{{0, 0, -1, -1}, {0, 0, 8, 7}}}) {
        const auto part = TargetFor(*source, 9, 8);
        part->Fill(0);
        ASSERT_TRUE(ResampleFastLinear(*source, *part, &test.asked, kNobody));
        for (std::int32_t y = 0; y < 8; ++y) {
            for (std::int32_t x = 0; x < 9; ++x) {
                const TRect& inside = test.computed;
                const bool computed =
                    x >= inside.left && x <= inside.right && y >= inside.top && y <= inside.bottom;
                EXPECT_EQ(part->GetPixels_zm24RGB(x, y),
                          computed ? whole->GetPixels_zm24RGB(x, y) : TRGB{})
                    << x << ',' << y;
            }
        }
    }
}

// 1-bit sources.

TEST(ResampleBitsTest, EnlargesWithSeventeenFractionalBits) {
    // x=1: 255 + ((-255 * 65536) >> 17) = 255 - 128: the shift rounds down.
    const auto source = GrayPicture(zm1g, {{1, 0}});
    TZmBitmap target(4, 1, zm24RGB);
    ASSERT_TRUE(ResampleBitsFastLinear(*source, target));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{255, 127, 0, 0}}));
    // Down the rows: row 0.5 of the greys 255 and 0; row 1.5 has no next row.
    const auto column = GrayPicture(zm1g, {{1}, {0}});
    TZmBitmap higher(1, 4, zm24RGB);
    ASSERT_TRUE(ResampleBitsFastLinear(*column, higher));
    EXPECT_EQ(ValuesOf(higher), (TMatrix{{255}, {127}, {0}, {0}}));
}

TEST(ResampleBitsTest, ReducesToTheShareOfSetBits) {
    // Factor 2: columns 0..1 and 1..3, rows the same.
    const auto source = GrayPicture(zm1g, {{1, 1, 0, 0}, {1, 0, 0, 0}, {0, 0, 0, 1}, {0, 1, 1, 1}});
    TZmBitmap target(2, 2, zm24RGB);
    ASSERT_TRUE(ResampleBitsFastLinear(*source, target));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{3 * 255 / 4, 1 * 255 / 6}, {2 * 255 / 6, 4 * 255 / 9}}));
}

TEST(ResampleBitsTest, FootprintsOfRowsEndEarlierThanThoseOfColumns) {
    // Factor 2.75. Target pixel 1: rows 1 to Trunc(1 + 2.75) = 3, columns 1 to
    // Trunc(1.375 + 2.75) = 4.
    TMatrix in_column_4(11, std::vector<int>(11, 0));
    TMatrix in_row_4 = in_column_4;
    in_column_4[2][4] = 1;
    in_row_4[4][2] = 1;
    TZmBitmap target(4, 4, zm24RGB);
    ASSERT_TRUE(ReduceBits(*GrayPicture(zm1g, in_column_4), target));
    EXPECT_EQ(ValuesOf(target)[1][1], 255 / 12);
    ASSERT_TRUE(ReduceBits(*GrayPicture(zm1g, in_row_4), target));
    EXPECT_EQ(ValuesOf(target)[1][1], 0);
}

// Kernel.

std::unique_ptr<TZmBitmap> Kernel(TZmBitmap& source, std::int32_t width, std::int32_t height,
                                  TResampleFilter filter) {
    auto target = TargetFor(source, width, height);
    EXPECT_TRUE(ResampleKernel(source, *target, filter, kNobody));
    return target;
}

TEST(ResampleKernelTest, HandWorkedValuesOfTheTriangle) {
    const std::vector<TEngineCase> cases{
        // First and last pixels coincide; 128/128 between.
        {"enlarge", {{0, 100, 200}}, 5, 1, {{0, 50, 100, 150, 200}}},
        {"enlarge rows", {{0}, {100}, {200}}, 1, 5, {{0}, {50}, {100}, {150}, {200}}},
        // Scale 1/2, weights 64 128 64. Left of the edge pixel -1 is pixel 1: 20 10 20; right of
        // it pixel 5 is pixel 4: (40 * 64 + 90 * 192) / 256 = 77.5, truncated.
        {"shrink", {{10, 20, 30, 40, 90}}, 3, 1, {{15, 30, 77}}},
        // Two weights of Round(42.67) and one of Round(85.33): 43 + 85 + 43 = 171, so the
        // quotient is by 171. Scale 1/3 over 7 pixels: 3 columns at 0, 3, 6; at the left taps
        // -2..2 of 28 57 85 57 28 give 255: (28*2*v2 + 57*2*v1 + 85*v0) / 255.
        {"sum of weights", {{0, 90, 0, 0, 0, 0, 0}}, 3, 1, {{114 * 90 / 255, 28 * 90 / 255, 0}}},
        {"one pixel", {{50}}, 3, 3, {{50, 50, 50}, {50, 50, 50}, {50, 50, 50}}},
    };
    for (const TEngineCase& test : cases) {
        SCOPED_TRACE(test.name);
        const auto color = ColorPicture(test.source);
        EXPECT_EQ(ValuesOf(*Kernel(*color, test.width, test.height, rfTriangle)), test.expected);
        for (const TZmPixelFormat format : {zm8g, zm16g}) {
            const auto gray = GrayPicture(format, test.source);
            EXPECT_EQ(ValuesOf(*Kernel(*gray, test.width, test.height, rfTriangle)), test.expected);
        }
    }
}

TEST(ResampleKernelTest, EachFilterHasItsOwnKernel) {
    // A step of 0 to 200 enlarged by 2 with ends aligned: column 5 of 9 lies midway between
    // samples 2 and 3 (of 0 0 0 200 200), column 4 on sample 2, column 6 on sample 3. Weights at
    // distance 0, 0.5, 1, 1.5, 2, 2.5 in 256ths.
    struct TFilterCase {
        TResampleFilter filter;
        std::array<int, 3> expected;  // columns 4, 5, 6
    };
    const std::vector<TFilterCase> cases{
        {rfTriangle, {0, 100, 200}},  // 256 128 0
        {rfHermite, {0, 100, 200}},   // 256 128 0
        // Bell: 192 at 0, 128 at 0.5, 32 at 1, 0 at 1.5. 32 * 200 / 256 = 25, then half, then
        // 224 * 200 / 256 = 175.
        {rfBell, {25, 100, 175}},
        // B-spline: Round(170.67) = 171 at 0, 123 (0.479) at 0.5, 43 at 1, 5 (0.0208) at 1.5.
        // 43 * 200 / 257 = 33; 214 * 200 / 257 = 166.
        {rfBSpline, {33, 100, 166}},
        // Lanczos: 256 at 0; 0.6079 -> 156 at 0.5, -0.1351 -> -35 at 1.5, 0.0243 -> 6 at 2.5.
        // Column 5: half the weights on either side, column 4 and 6 exact.
        {rfLanczos3, {0, 100, 200}},
        // Mitchell: Round(227.56) = 228 at 0, 137 (0.534) at 0.5, 14 at 1, -9 at 1.5.
        // 14 * 200 / 256 = 10; 242 * 200 / 256 = 189.
        {rfMitchell, {10, 100, 189}},
        // One of the two at 0.5: the kernel takes 0.5 and not -0.5, the sample before.
        {rfNearest, {0, 0, 200}},
        {rfLinear, {0, 100, 200}},
    };
    const auto source = ColorPicture({{0, 0, 0, 200, 200}});
    for (const TFilterCase& test : cases) {
        SCOPED_TRACE(int{test.filter});
        const TMatrix values = ValuesOf(*Kernel(*source, 9, 1, test.filter));
        for (std::size_t i = 0; i < 3; ++i) {
            EXPECT_EQ(values[0][4 + i], test.expected[i]) << "column " << 4 + i;
        }
    }
}

TEST(ResampleKernelTest, LanczosOvershootsAndIsLimited) {
    // Column 3 of 9 lies between samples 1 and 2 of 0 0 0 200 200: weights 6 -35 156 156 -35 6
    // at samples -1 to 4: 200 * (-35 + 6) is below 0. Column 7: samples 1 to 6 reflected
    // (1 2 3 4 4 3): 200 * (156 + 156 - 35 + 6) + ... = 56600 / 254 = 222.
    const auto source = ColorPicture({{0, 0, 0, 200, 200}});
    const TMatrix values = ValuesOf(*Kernel(*source, 9, 1, rfLanczos3));
    EXPECT_EQ(values[0][3], 0);
    EXPECT_EQ(values[0][7], 200 * (156 + 156 - 35 + 6) / (2 * (156 - 35 + 6)));
}

TEST(ResampleKernelTest, WeightsThatVanishGiveBlack) {
    // Shrinking 2000 to 1: each weight is below half a 256th, and no tap is left.
    const auto source = GrayPicture(zm8g, TMatrix{std::vector<int>(2000, 255)});
    EXPECT_EQ(ValuesOf(*Kernel(*source, 1, 1, rfTriangle)), (TMatrix{{0}}));
    EXPECT_EQ(
        ValuesOf(*Kernel(*ColorPicture(TMatrix{std::vector<int>(2000, 255)}), 1, 1, rfTriangle)),
        (TMatrix{{0}}));
}

TEST(ResampleKernelTest, BitsBecomeGrays) {
    const auto source = GrayPicture(zm1g, {{1, 0, 1}});
    TZmBitmap target(5, 1, zm1g);
    ASSERT_TRUE(ResampleKernel(*source, target, rfTriangle, kNobody));
    EXPECT_EQ(target.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(ValuesOf(target), (TMatrix{{255, 127, 0, 127, 255}}));
}

/// Settings of the worker threads for the duration of a test.
class TThreadSettings {
public:
    explicit TThreadSettings(std::int32_t cores) : cores_(ZmGlobalSettings().fDefaultCoresCount) {
        ZmGlobalSettings().fDefaultCoresCount = cores;
    }
    ~TThreadSettings() { ZmGlobalSettings().fDefaultCoresCount = cores_; }

private:
    std::int32_t cores_;
};

TEST(ResampleKernelTest, ThreadsGiveTheSameBytesAndRiseWithTheSize) {
    const auto run = [](std::int32_t side, std::int32_t cores, bool& on_worker) {
        const TThreadSettings settings(cores);
        const auto source = MakeNoise(zm24RGB, side, side, 5);
        auto target = TargetFor(*source, 97, 61);
        on_worker = false;
        std::int32_t last = 0;
        const TResampleListener listener{
            nullptr, [&, home = std::this_thread::get_id()](void*, std::int32_t percent) {
                on_worker = on_worker || std::this_thread::get_id() != home;
                EXPECT_GT(percent, last);
                last = percent;
            }};
        EXPECT_TRUE(ResampleKernel(*source, *target, rfLanczos3, listener));
        // Counted in rows of the source, but of a total with the target's columns.
        EXPECT_EQ(last, static_cast<std::int32_t>((side + 61) * (100 / (97 + side + 0.5))));
        return target;
    };
    bool on_worker = false;
    const auto one = run(300, 1, on_worker);
    EXPECT_FALSE(on_worker);
    const auto four = run(300, 4, on_worker);
    EXPECT_TRUE(on_worker);
    ExpectSamePixels(*one, *four);
    run(200, 4, on_worker);
    EXPECT_FALSE(on_worker) << "40000 pixels are too few";
}

// Projection.

TEST(ResampleProjectionTest, KeepsThinFeatures) {
    // Columns: 0 alone, then 0 to 2. Rows: 0 alone, then 0 to 2.
    const TMatrix white(4, std::vector<int>(4, 255));
    TMatrix black_dot = white;
    black_dot[1][1] = 127;
    TMatrix not_black = white;
    not_black[1][1] = 128;
    for (const bool bits : {false, true}) {
        const auto picture = [&](const TMatrix& values) {
            return bits ? GrayPicture(zm1g, values) : ColorPicture(values);
        };
        TMatrix dot = black_dot;
        dot[1][1] = bits ? 0 : 127;
        TZmBitmap target(2, 2, zm24RGB);
        ASSERT_TRUE(ResampleProjection(*picture(dot), target, rfProjectBW));
        EXPECT_EQ(target.GetPixelFormat(), zm1g);
        EXPECT_EQ(ValuesOf(target), (TMatrix{{1, 1}, {1, 0}}));
        ASSERT_TRUE(ResampleProjection(*picture(not_black), target, rfProjectBW));
        EXPECT_EQ(ValuesOf(target), (TMatrix{{1, 1}, {1, 1}}));
    }
}

TEST(ResampleProjectionTest, KeepsWhiteFeatures) {
    TMatrix values(4, std::vector<int>(4, 0));
    values[0][0] = 129;
    values[0][3] = 255;
    TZmBitmap target(2, 2, zm1g);
    ASSERT_TRUE(ResampleProjection(*ColorPicture(values), target, rfProjectWB));
    // Column 3 is never looked at; the dot at 0,0 shows in all four.
    EXPECT_EQ(ValuesOf(target), (TMatrix{{1, 1}, {1, 1}}));
    values[0][0] = 128;
    ASSERT_TRUE(ResampleProjection(*ColorPicture(values), target, rfProjectWB));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{0, 0}, {0, 0}}));
}

TEST(ResampleProjectionTest, AllThreeChannelsDecide) {
    TZmBitmap source(2, 1, zm24RGB);
    source.SetPixels_zm24RGB(0, 0, TRGB{0, 0, 200});
    source.SetPixels_zm24RGB(1, 0, TRGB{0, 0, 200});
    TZmBitmap target(1, 1, zm1g);
    ASSERT_TRUE(ResampleProjection(source, target, rfProjectBW));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{1}}));
    ASSERT_TRUE(ResampleProjection(source, target, rfProjectWB));
    EXPECT_EQ(ValuesOf(target), (TMatrix{{0}}));
}

// The scaler.

TMatrix Scaled(const TMatrix& values, std::int32_t width, TResampleFilter filter) {
    const auto source = GrayPicture(zm8g, values);
    const auto target = TargetFor(*source, width, 1);
    EXPECT_TRUE(ResampleScaler(*source, *target, filter, TScalerChoice::kOwn));
    return ValuesOf(*target);
}

TEST(ResampleScalerTest, AlignsCentres) {
    EXPECT_EQ(Scaled({{10, 20, 30}}, 1, rfWICNearestNeighbor), (TMatrix{{20}}));
    EXPECT_EQ(Scaled({{0, 100}}, 4, rfWICNearestNeighbor), (TMatrix{{0, 0, 100, 100}}));
    // Centres at -0.25, 0.25, 0.75, 1.25.
    EXPECT_EQ(Scaled({{0, 100}}, 4, rfWICLinear), (TMatrix{{0, 25, 75, 100}}));
    EXPECT_EQ(Scaled({{0, 60, 30}}, 2, rfWICFant), (TMatrix{{20, 40}}));
    EXPECT_EQ(Scaled({{10, 200}}, 3, rfWICFant), (TMatrix{{10, 105, 200}}));
    // Halfway: -1/16, 9/16, 9/16, -1/16.
    EXPECT_EQ(Scaled({{0, 0, 160, 160}}, 2, rfWICCubic), (TMatrix{{0, 170}}));
}

TEST(ResampleScalerTest, KeepsConstantPicturesOfEveryFormat) {
    // The platform's scaler where there is one.
    for (int format = zm1g; format <= zm32RGB; ++format) {
        SCOPED_TRACE(PixelFormatInfo(static_cast<TZmPixelFormat>(format)).name);
        const auto one = MakeNoise(static_cast<TZmPixelFormat>(format), 1, 1, 9);
        const auto source = TargetFor(*one, 5, 4);
        ASSERT_TRUE(ResampleNearest(*one, *source));
        for (int filter = rfWICNearestNeighbor; filter <= rfWICFant; ++filter) {
            const auto target = TargetFor(*source, 8, 3);
            ASSERT_TRUE(ResampleScaler(*source, *target, static_cast<TResampleFilter>(filter)));
            EXPECT_EQ(target->GetPixels(7, 2), source->GetPixels(0, 0)) << filter;
            EXPECT_EQ(target->GetPixels(0, 0), source->GetPixels(0, 0)) << filter;
        }
    }
}

}  // namespace
}  // namespace zm::test
