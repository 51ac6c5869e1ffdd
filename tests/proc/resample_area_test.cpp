// The area engine of rfBilinear and rfBicubic: values worked by hand, an independent reference,
// and the fast forms against the plain one.

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
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

// An independent reference: the pieces of both axes as lists, then each target pixel for itself.

struct TPiece {
    int source;
    double fraction;
    double length;
};

/// The pieces of each target pixel of an axis.
std::vector<std::vector<TPiece>> AxisPieces(int source_size, int target_size) {
    const double step = static_cast<double>(source_size) / target_size;
    std::vector<std::vector<TPiece>> result(static_cast<std::size_t>(target_size));
    double position = 0;
    double last = 0;
    int border = 1;
    std::size_t pixel = 0;
    while (pixel < result.size()) {
        const bool cut = border < source_size && position + step > border + 0.0001;
        if (!cut) {
            position += step;
        }
        const double end = cut ? border : position;
        const double length = end - last;
        last = last + length;
        result[pixel].push_back({border - 1, cut ? 1.0 : position - (border - 1), length});
        border += cut ? 1 : 0;
        pixel += cut ? 0 : 1;
    }
    return result;
}

double ReferenceCubic(const std::array<double, 4>& samples, double t, double limit) {
    const auto inner = [](double v) { return v * v * v - 2 * (v * v) + 1; };
    const auto outer = [](double v) { return -(v * v * v) + 5 * (v * v) - 8 * v + 4; };
    const double sum = samples[0] * outer(std::abs(1 + t)) + samples[1] * inner(std::abs(t)) +
                       samples[2] * inner(std::abs(t - 1)) + samples[3] * outer(std::abs(t - 2));
    return std::min(std::max(sum, 0.0), limit);
}

class TReference {
public:
    TReference(TZmBitmap& source, TZmBitmap* alpha, bool cubic)
        : source_(source),
          alpha_(alpha),
          cubic_(cubic),
          wide_(source.GetPixelFormat() == zm16g || source.GetPixelFormat() == zm48RGB),
          limit_(wide_ ? 65535 : 255) {}

    void Fill(TZmBitmap& target) {
        const auto columns = AxisPieces(source_.GetWidth(), target.GetWidth());
        const auto rows = AxisPieces(source_.GetHeight(), target.GetHeight());
        sx_ = static_cast<double>(source_.GetWidth()) / target.GetWidth();
        sy_ = static_cast<double>(source_.GetHeight()) / target.GetHeight();
        for (std::size_t y = 0; y < rows.size(); ++y) {
            for (std::size_t x = 0; x < columns.size(); ++x) {
                for (int channel = 0; channel < source_.GetChannelCount(); ++channel) {
                    Put(target, x, y, channel, Sum(columns[x], rows[y], channel));
                }
            }
        }
    }

private:
    double Sum(const std::vector<TPiece>& columns, const std::vector<TPiece>& rows,
               int channel) const {
        const bool both = sx_ < 1 && sy_ < 1;
        if (both && !cubic_ && !wide_ && source_.GetChannelCount() == 4 && channel > 0) {
            return 0;
        }
        double sum = 0;
        for (const TPiece& row : rows) {
            for (const TPiece& column : columns) {
                const double weight = column.length * row.length;
                sum +=
                    weight * (cubic_ ? Cubic(column, row, channel) : Linear(column, row, channel));
            }
        }
        return sum * (1 / (sx_ * sy_));
    }

    double At(int x, int y, int channel) const {
        x = std::clamp(x, 0, source_.GetWidth() - 1);
        y = std::clamp(y, 0, source_.GetHeight() - 1);
        return ChannelValue(source_, x, y, channel);
    }

    double Linear(const TPiece& column, const TPiece& row, int channel) const {
        std::array<double, 4> corner{};
        std::array<int, 4> opacity{};
        for (std::size_t i = 0; i < 4; ++i) {
            const int x = std::min(column.source + static_cast<int>(i % 2), source_.GetWidth() - 1);
            const int y = std::min(row.source + static_cast<int>(i / 2), source_.GetHeight() - 1);
            corner[i] = At(x, y, channel);
            opacity[i] = alpha_ != nullptr ? alpha_->GetPixels_zm8(x, y) : 255;
        }
        const double fx = column.fraction;
        const double fy = row.fraction;
        if (sx_ >= 1) {
            return sy_ >= 1 ? corner[0] : corner[0] * (1 - fy) + corner[2] * fy;
        }
        if (sy_ >= 1) {
            return (1 - fx) * corner[0] + fx * corner[1];
        }
        const int least = *std::min_element(opacity.begin(), opacity.end());
        for (std::size_t i = 4; i-- > 0 && source_.GetChannelCount() == 3 && !wide_;) {
            if (opacity[i] > least) {
                const double color = corner[i];
                corner.fill(color);
                break;
            }
        }
        return ((1 - fx) * corner[0] + fx * corner[1]) * (1 - fy) +
               ((1 - fx) * corner[2] + fx * corner[3]) * fy;
    }

    double CubicAlongRow(const TPiece& column, int y, int channel) const {
        const int x = column.source;
        return ReferenceCubic({At(x - 1, y, channel), At(x, y, channel), At(x + 1, y, channel),
                               At(x + 2, y, channel)},
                              column.fraction, limit_);
    }

    double Cubic(const TPiece& column, const TPiece& row, int channel) const {
        if (sy_ >= 1) {
            return sx_ >= 1 ? At(column.source, row.source, channel)
                            : CubicAlongRow(column, row.source, channel);
        }
        std::array<double, 4> samples{};
        for (int i = 0; i < 4; ++i) {
            const int y = row.source - 1 + i;
            samples[static_cast<std::size_t>(i)] =
                sx_ >= 1 ? At(column.source, y, channel)
                         : std::nearbyint(CubicAlongRow(column, y, channel));
        }
        return ReferenceCubic(samples, row.fraction, limit_);
    }

    void Put(TZmBitmap& target, std::size_t x, std::size_t y, int channel, double value) const {
        const double limited = std::clamp(std::nearbyint(value), 0.0, limit_);
        std::uint8_t* row = target.GetScanLine(static_cast<std::int32_t>(y));
        const std::size_t index = x * static_cast<std::size_t>(target.GetChannelCount()) +
                                  static_cast<std::size_t>(channel);
        if (wide_) {
            const auto word = static_cast<std::uint16_t>(limited);
            std::memcpy(row + 2 * index, &word, 2);
        } else {
            row[index] = static_cast<std::uint8_t>(limited);
        }
    }

    TZmBitmap& source_;
    TZmBitmap* alpha_;
    bool cubic_;
    bool wide_;
    double limit_;
    double sx_ = 1;
    double sy_ = 1;
};

void CompareWithReference(TZmPixelFormat format, TZmImageSize from, TZmImageSize to, bool cubic,
                          bool with_alpha) {
    SCOPED_TRACE(testing::Message()
                 << PixelFormatInfo(format).name << ' ' << from.width << 'x' << from.height
                 << " to " << to.width << 'x' << to.height << (cubic ? " cubic" : " linear")
                 << (with_alpha ? " alpha" : ""));
    const auto seed = static_cast<std::uint32_t>(from.width * 1000 + from.height + to.width);
    const auto source = MakeNoise(format, from.width, from.height, seed);
    if (with_alpha) {
        AddNoiseAlpha(*source, seed + 1);
    }
    TZmBitmap* alpha = source->GetAlphaChannelRaw();
    TZmBitmap expected(to.width, to.height, format);
    TReference(*source, alpha, cubic).Fill(expected);
    TZmBitmap plain(to.width, to.height, format);
    const auto interpolation = cubic ? kCubic : kLinear;
    ASSERT_TRUE(ResampleAreaPlain(*source, plain, alpha, interpolation, kNobody));
    ExpectSamePixels(expected, plain);
    TZmBitmap chosen(to.width, to.height, format);
    ASSERT_TRUE(ResampleArea(*source, chosen, alpha, interpolation, kNobody));
    ExpectSamePixels(expected, chosen);
}

TEST(ResampleAreaTest, EqualsAnIndependentReference) {
    const std::array<TZmImageSize, 12> sizes{{{1, 1},
                                              {1, 9},
                                              {9, 1},
                                              {2, 3},
                                              {5, 7},
                                              {13, 4},
                                              {16, 15},
                                              {31, 8},
                                              {7, 33},
                                              {40, 40},
                                              {3, 50},
                                              {61, 2}}};
    for (const TZmPixelFormat format : {zm8g, zm24RGB, zm32RGB, zm16g, zm48RGB}) {
        for (const TZmImageSize from : sizes) {
            for (const TZmImageSize to : sizes) {
                for (const bool cubic : {false, true}) {
                    CompareWithReference(format, from, to, cubic, /*with_alpha=*/false);
                    if (format == zm24RGB) {
                        CompareWithReference(format, from, to, cubic, /*with_alpha=*/true);
                    }
                    ASSERT_FALSE(testing::Test::HasFailure());
                }
            }
        }
    }
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
            if (format != zm32RGB || interpolation == kCubic || to.width <= from.width) {
                CompareFastWithPlain(format, from, to, content, interpolation);
            }
        }
    }
}

TEST(ResampleAreaFastTest, EqualsThePlainFormWhenShrinking) {
    for (std::int32_t width = 1; width <= 70; ++width) {
        const std::int32_t height = 1 + width * 5 % 23;
        for (const std::int32_t divisor : {1, 2, 3, 5, 64}) {
            const TZmImageSize to{std::max(width * 3 / (divisor * 2 + 1), 1),
                                  std::max(height / divisor, 1)};
            CompareAllFormats({width, height}, to, static_cast<TContent>(width % kContentCount));
            ASSERT_FALSE(testing::Test::HasFailure());
        }
    }
}

TEST(ResampleAreaFastTest, EqualsThePlainFormWhenEnlarging) {
    for (std::int32_t width = 1; width <= 70; ++width) {
        const std::int32_t height = 1 + width * 5 % 17;
        for (const std::int32_t growth : {1, 2, 3 + width % 5}) {
            const TZmImageSize to{width * growth + width % 5 + 1, height * growth + width % 3 + 1};
            CompareAllFormats({width, height}, to,
                              static_cast<TContent>((width + growth) % kContentCount));
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
