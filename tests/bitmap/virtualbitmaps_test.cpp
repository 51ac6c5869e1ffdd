#include "engine/bitmap/zmvirtualbitmaps.h"

#include <gtest/gtest.h>

#include <vector>

#include "tests/bitmap/place_support.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

using test::ExpectSameAlpha;
using test::ExpectSamePixels;
using test::MakeGradient;
using test::MakeNoise;

/// A bitmap with pixels of its own from a view.
std::unique_ptr<TZmBitmap> CopyOf(TZmBitmap& view) {
    auto copy = std::make_unique<TZmBitmap>();
    copy->AssignImage(&view);
    return copy;
}

TEST(ClippedView, ShowsTheRectangleInEveryFormat) {
    for (const TZmPixelFormat format : test::kAllFormats) {
        auto source = MakeNoise(format, 37, 9, 4);
        test::AddNoiseAlpha(*source, 5);
        const TRect rect{11, 2, 31, 7};
        TZmVirtualClippedBitmap view(*source, rect);
        ASSERT_EQ(20, view.GetWidth());
        ASSERT_EQ(5, view.GetHeight());
        EXPECT_TRUE(view.GetIsVirtual());
        TZmBitmap expected(*source, rect);
        ExpectSamePixels(expected, *CopyOf(view));
        ExpectSameAlpha(expected, *CopyOf(view));
    }
}

TEST(ClippedView, IsLimitedToItsSource) {
    auto source = MakeGradient(zm24RGB, 8, 6);
    TZmVirtualClippedBitmap view(*source, TRect{-5, 4, 100, 2147483647});
    EXPECT_EQ(8, view.GetWidth());
    EXPECT_EQ(2, view.GetHeight());
    EXPECT_EQ(source->GetPixels(7, 5), view.GetPixels(7, 1));
    for (const TRect& rect :
         {TRect{8, 0, 9, 1}, TRect{3, 3, 3, 5}, TRect{5, 0, 2, 6}, TRect{-9, -9, -1, -1}}) {
        TZmVirtualClippedBitmap empty(*source, rect);
        EXPECT_TRUE(empty.IsEmpty());
    }
}

TEST(ClippedView, FollowsItsSource) {
    auto source = MakeGradient(zm24RGB, 8, 6);
    TZmVirtualClippedBitmap view(*source, TRect{2, 2, 6, 6});
    source->SetPixels(3, 4, TRGB{9, 8, 7});
    EXPECT_EQ((TRGB{9, 8, 7}), view.GetPixels(1, 2));
    source->SetPixelFormat(zm48RGB);  // the caller's mistake: no row rather than a wrong one
    EXPECT_EQ(nullptr, view.GetScanLine(0));
    TBitmap dest;
    view.CopyToTBitmap(&dest);
    EXPECT_EQ(0, dest.GetScanLine(1)[2]);
}

TEST(ClippedView, PlanesOfAnotherSizeEndOpaque) {
    auto source = MakeGradient(zm24RGB, 20, 6);
    source->ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(10, 3, zmMemory));
    source->GetAlphaChannel()->Fill(4.0);
    TZmVirtualClippedBitmap view(*source, TRect{5, 1, 15, 6});
    EXPECT_EQ(4, view.GetAlpha(4, 1));
    EXPECT_EQ(255, view.GetAlpha(5, 1));
    EXPECT_EQ(255, view.GetAlpha(0, 2));
    TZmVirtualClippedBitmap beyond(*source, TRect{15, 4, 20, 6});
    EXPECT_EQ(255, beyond.GetAlpha(0, 0));
    TZmVirtualClippedBitmap plain(*source, TRect{5, 1, 15, 6}, TZmViewAlpha::kWithoutPlane);
    EXPECT_FALSE(plain.HasAlphaChannel());
}

TEST(ClippedView, ReadsFileBackedSourcesAndViews) {
    TZmBitmap source;
    source.SetMinFileSize(0);
    source.Assign(MakeNoise(zm24RGB, 40, 20, 9).get());
    ASSERT_EQ(zmFile, source.GetLocation());
    TZmVirtualClippedBitmap view(source, TRect{10, 5, 30, 15});
    TZmVirtualClippedBitmap inner(view, TRect{2, 3, 9, 8});
    TZmBitmap expected(source, TRect{12, 8, 19, 13});
    ExpectSamePixels(expected, *CopyOf(inner));
}

TEST(RotatedView, TurnsCounterClockwise) {
    for (const TZmPixelFormat format : test::kAllFormats) {
        auto source = MakeNoise(format, 5, 3, 6);
        test::AddNoiseAlpha(*source, 7);
        for (const std::int32_t turns : {0, 1, 2, 3, -1, 5}) {
            TZmVirtualRotatedBitmap view(*source, turns);
            const bool is_upright = turns % 2 == 0;
            ASSERT_EQ(is_upright ? 5 : 3, view.GetWidth());
            ASSERT_EQ(is_upright ? 3 : 5, view.GetHeight());
            for (std::int32_t y = 0; y < 3; ++y) {
                for (std::int32_t x = 0; x < 5; ++x) {
                    // Where the turn takes (x, y): one quarter brings the right side to the top.
                    const std::int32_t places[4][2] = {
                        {x, y}, {y, 4 - x}, {4 - x, 2 - y}, {2 - y, x}};
                    const std::int32_t to_x = places[turns & 3][0];
                    const std::int32_t to_y = places[turns & 3][1];
                    ASSERT_EQ(source->GetPixels(x, y), view.GetPixels(to_x, to_y))
                        << PixelFormatInfo(format).name << ", " << turns << " turns";
                    ASSERT_EQ(source->GetAlpha(x, y), view.GetAlpha(to_x, to_y));
                }
            }
        }
    }
}

TEST(RotatedView, PlanesOfAnotherSizeEndOpaque) {
    auto source = MakeGradient(zm24RGB, 6, 4);
    source->ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(2, 1, zmMemory));
    source->GetAlphaChannel()->Fill(4.0);
    TZmVirtualRotatedBitmap view(*source, 1);
    EXPECT_EQ(4, view.GetAlpha(0, 5));
    EXPECT_EQ(4, view.GetAlpha(0, 4));
    EXPECT_EQ(255, view.GetAlpha(0, 3));
    EXPECT_EQ(255, view.GetAlpha(1, 5));
}

TEST(VirtualBitmap, EventsAndProvidersCanBeDrawn) {
    TZmBitmap checks(4, 4, zm8g);
    checks.SetOnRenderVirtualPixel([](TZmBitmap*, std::int32_t x, std::int32_t y, void* pixel) {
        *static_cast<std::uint8_t*>(pixel) = (x + y) % 2 == 0 ? 200 : 10;
    });
    TZmBitmap dest(4, 4, zm24RGB);
    dest.Fill(0.0);
    checks.DrawToTZmBitmap(&dest, 1, 0);
    EXPECT_EQ(200, dest.GetPixels(1, 0).g);
    EXPECT_EQ(10, dest.GetPixels(1, 1).g);
    EXPECT_EQ(0, dest.GetPixels(0, 0).g);

    // A view of the picture that is drawn into, in a file: rows are read before they change.
    TZmBitmap image;
    image.SetMinFileSize(0);
    image.Assign(MakeGradient(zm24RGB, 12, 12).get());
    const TRGB expected = image.GetPixels(3, 3);
    TZmVirtualClippedBitmap view(image, TRect{0, 0, 6, 6});
    view.DrawToTZmBitmap(&image, 6, 6);
    EXPECT_EQ(expected, image.GetPixels(9, 9));

    TZmBitmap nothing(4, 4, zm24RGB);
    nothing.SetVirtualProvider(nullptr);
    nothing.SetOnRenderVirtualPixel([](TZmBitmap*, std::int32_t, std::int32_t, void*) {});
    checks.DrawToTZmBitmap(&nothing, 0, 0);  // a picture without pixels takes none
}

}  // namespace
}  // namespace zm
