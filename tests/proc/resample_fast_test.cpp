// The fast forms of the kernel and the Fast linear engines against the plain ones, byte by byte.

#include <gtest/gtest.h>

#include <cstdlib>
#include <utility>
#include <vector>

#include "engine/proc/zmresample.h"
#include "engine/proc/zmresample_p.h"
#include "tests/proc/resample_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

/// Plain and fast form of an engine on guarded pictures of odd addresses.
template <typename Engine>
void CompareForms(TZmPixelFormat format, TZmImageSize from, TZmImageSize to, TContent content,
                  const Engine& engine) {
    SCOPED_TRACE(testing::Message()
                 << PixelFormatInfo(format).name << ' ' << from.width << 'x' << from.height
                 << " to " << to.width << 'x' << to.height << " content " << int{content});
    const std::size_t offset = format == zm16g ? 2 : static_cast<std::size_t>(from.width) % 5;
    TGuardedPicture source(format, from.width, from.height, offset);
    FillContent(source.Bitmap(), content, static_cast<std::uint32_t>(from.width * 7 + to.width));
    TZmBitmap plain(to.width, to.height, format);
    ASSERT_TRUE(engine(source.Bitmap(), plain, TResampleForm::kPlain));
    ForSomeInstructionSets(from.width, [&] {
        TGuardedPicture fast(format, to.width, to.height, offset);
        ASSERT_TRUE(engine(source.Bitmap(), fast.Bitmap(), TResampleForm::kFast));
        ExpectSamePixels(plain, fast.Bitmap());
        fast.ExpectGuardsIntact();
    });
    source.ExpectGuardsIntact();
}

/// Sizes in both directions, apart for columns and rows, for widths of 1 to 70 and extremes.
template <typename Engine>
void CompareAtAllSizes(const Engine& engine) {
    std::vector<std::pair<TZmImageSize, TZmImageSize>> sizes{
        {{1, 1}, {70, 3}},   {{2, 2}, {1, 1}},     {{9000, 2}, {2, 3}},   {{2, 3}, {9000, 2}},
        {{2, 9000}, {3, 1}}, {{3, 2}, {2, 20011}}, {{257, 9}, {256, 33}}, {{64, 64}, {16, 256}},
    };
    for (std::int32_t width = 1; width <= 70; ++width) {
        const std::int32_t height = 1 + width * 5 % 17;
        sizes.push_back({{width, height}, {width * 3 / 4 + 1, height * 2 + width % 5}});
        sizes.push_back({{width, height}, {width * 4 + width % 3, height / 3 + 1}});
        sizes.push_back({{width, height}, {width + 1 + width % 7, height * 4 + 3}});
        sizes.push_back({{width, height}, {(width + 3) / 4, (height + 1) / 2}});
    }
    for (std::size_t i = 0; i < sizes.size(); ++i) {
        for (const TZmPixelFormat format : {zm8g, zm24RGB, zm16g}) {
            CompareForms(format, sizes[i].first, sizes[i].second,
                         static_cast<TContent>(i % kContentCount), engine);
            ASSERT_FALSE(testing::Test::HasFailure());
        }
    }
}

TEST(ResampleFormsTest, FastLinear) {
    CompareAtAllSizes([](TZmBitmap& source, TZmBitmap& target, TResampleForm form) {
        return ResampleFastLinear(source, target, nullptr, kNobody, form);
    });
}

/// Spans of 2 to 10 pixels, whole ratios and others, with all lengths of the last vector.
TEST(ResampleFormsTest, FastLinearByWindows) {
    for (std::int32_t width = 90; width <= 250; width += 5) {
        for (const std::int32_t tenths : {10, 11, 15, 20, 25, 33, 40, 47, 55, 70, 80, 85, 95}) {
            const TZmImageSize to{width * 10 / tenths, 4};
            for (const TZmPixelFormat format : {zm8g, zm24RGB}) {
                CompareForms(format, {width, 7}, to, width % 2 == 0 ? kNoiseContent : kSteps,
                             [](TZmBitmap& source, TZmBitmap& target, TResampleForm form) {
                                 return ResampleFastLinear(source, target, nullptr, kNobody, form);
                             });
            }
            ASSERT_FALSE(testing::Test::HasFailure());
        }
    }
}

TEST(ResampleFormsTest, FastLinearInARectangle) {
    const TRect rect{3, 2, 30, 11};
    CompareForms(zm24RGB, {71, 30}, {35, 14}, kNoiseContent,
                 [&](TZmBitmap& source, TZmBitmap& target, TResampleForm form) {
                     FillContent(target, kSteps, 1);
                     return ResampleFastLinear(source, target, &rect, kNobody, form);
                 });
}

TEST(ResampleFormsTest, Kernels) {
    for (const TResampleFilter filter : {rfTriangle, rfBSpline, rfLanczos3, rfMitchell}) {
        SCOPED_TRACE(testing::Message() << "filter " << int{filter});
        CompareAtAllSizes([&](TZmBitmap& source, TZmBitmap& target, TResampleForm form) {
            return ResampleKernel(source, target, filter, kNobody, form);
        });
    }
}

/// Bits give greys in colour.
TEST(ResampleFormsTest, KernelsOnBits) {
    const auto source = MakeNoise(zm1g, 61, 37, 5);
    for (const TZmImageSize to : {TZmImageSize{20, 15}, TZmImageSize{100, 90}}) {
        TZmBitmap fast(to.width, to.height, zm24RGB);
        TZmBitmap plain(to.width, to.height, zm24RGB);
        ASSERT_TRUE(ResampleKernel(*source, fast, rfLanczos3, kNobody, TResampleForm::kFast));
        ASSERT_TRUE(ResampleKernel(*source, plain, rfLanczos3, kNobody, TResampleForm::kPlain));
        ExpectSamePixels(plain, fast);
    }
}

/// Every quotient that the fast forms may be asked for, at the sums around it.
TEST(TQuotientTest, EqualsTheTruncatingDivision) {
    for (std::int32_t divisor = -kMaxFloatDivisor; divisor <= kMaxFloatDivisor; ++divisor) {
        if (divisor == 0 || (std::abs(divisor) > 600 && divisor % 61 != 0)) {
            continue;
        }
        const TQuotient quotient(divisor);
        for (std::int32_t value = -2; value <= 258; ++value) {
            for (const std::int32_t offset : {-1, 0, 1, divisor / 2}) {
                const std::int32_t sum = value * divisor + offset;
                ASSERT_EQ(quotient(static_cast<float>(sum)), Clamp8(sum / divisor))
                    << sum << " / " << divisor;
            }
        }
    }
}

}  // namespace
}  // namespace zm::test
