#include <gtest/gtest.h>

#include <cstring>
#include <limits>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfiletypes.h"
#include "tests/bitmap/place_support.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();

using TValues = std::vector<int>;

/// An image of one row (or one column) of grey values, with twice the values plus 1 as alpha.
std::unique_ptr<TZmBitmap> MakeLine(const TValues& values, bool is_column) {
    const auto count = static_cast<std::int32_t>(values.size());
    auto bitmap = std::make_unique<TZmBitmap>(is_column ? 1 : count, is_column ? count : 1, zm8g);
    for (std::int32_t i = 0; i < count; ++i) {
        const auto value = static_cast<std::uint8_t>(values[static_cast<std::size_t>(i)]);
        bitmap->SetPixels_zm8(is_column ? 0 : i, is_column ? i : 0, value);
        bitmap->SetAlpha(is_column ? 0 : i, is_column ? i : 0,
                         static_cast<std::uint8_t>(2 * value + 1));
    }
    return bitmap;
}

TValues LineOf(TZmBitmap& bitmap, bool is_alpha) {
    TValues values;
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
            values.push_back(is_alpha ? bitmap.GetAlpha(x, y) : bitmap.GetPixels_zm8(x, y));
        }
    }
    return values;
}

/// Changes a row and a column of the values and expects others; a 9 has the alpha `fill_alpha`.
template <typename TChange>
void ExpectLine(const TValues& before, const TValues& after, int fill_alpha, TChange change) {
    TValues alphas;
    for (const int value : after) {
        alphas.push_back(value == 9 ? fill_alpha : 2 * value + 1);
    }
    for (const bool is_column : {false, true}) {
        const auto bitmap = MakeLine(before, is_column);
        change(*bitmap, is_column);
        EXPECT_EQ(LineOf(*bitmap, false), after);
        EXPECT_EQ(LineOf(*bitmap, true), alphas);
    }
}

TEST(CanvasResize, AlignsThePicture) {
    struct TCase {
        std::int32_t new_size;
        int align;  // 0 start, 1 centre, 2 end
        TValues values;
    };
    const TCase kCases[] = {
        {3, 0, {1, 2, 3}},
        {3, 1, {2, 3, 4}},
        {3, 2, {3, 4, 5}},
        {2, 1, {2, 3}},  // (5 - 2) / 2 = 1
        {8, 0, {1, 2, 3, 4, 5, 9, 9, 9}},
        {8, 1, {9, 1, 2, 3, 4, 5, 9, 9}},  // (8 - 5) / 2 = 1
        {8, 2, {9, 9, 9, 1, 2, 3, 4, 5}},
        {5, 2, {1, 2, 3, 4, 5}},
    };
    for (const TCase& test : kCases) {
        SCOPED_TRACE(test.new_size);
        ExpectLine({1, 2, 3, 4, 5}, test.values, 44, [&](TZmBitmap& bitmap, bool is_column) {
            const auto horiz = static_cast<TZmHorizAlign>(is_column ? 0 : test.align);
            const auto vert = static_cast<TZmVertAlign>(is_column ? test.align : 0);
            EXPECT_TRUE(bitmap.Resize(is_column ? 1 : test.new_size, is_column ? test.new_size : 1,
                                      9.0, 44, horiz, vert));
        });
    }
}

TEST(CanvasResize, AddsToTheSides) {
    struct TCase {
        std::int32_t before, after;
        TValues values;
    };
    const TCase kCases[] = {
        {2, 1, {9, 9, 1, 2, 3, 9}}, {-1, 0, {2, 3}}, {0, -2, {1}},    {-1, 2, {2, 3, 9, 9}},
        {2, -1, {9, 9, 1, 2}},      {2, -4, {9}},    {-3, 2, {9, 9}}, {-5, 4, {9, 9}},
        {0, 0, {1, 2, 3}},
    };
    for (const TCase& test : kCases) {
        SCOPED_TRACE(::testing::Message() << test.before << ", " << test.after);
        ExpectLine({1, 2, 3}, test.values, 0, [&](TZmBitmap& bitmap, bool is_column) {
            EXPECT_TRUE(is_column ? bitmap.Resize(0, test.before, 0, test.after, 9.0, 0)
                                  : bitmap.Resize(test.before, 0, test.after, 0, 9.0, 0));
        });
    }
}

TEST(CanvasResize, KeepsTheMarkOfAFullPlaneTrue) {
    struct TCase {
        std::int32_t add, fill_alpha;
        bool full;
    };
    constexpr TCase kCases[] = {{2, 255, true}, {2, 254, false}, {-1, 0, true}, {-1, 255, true}};
    for (const TCase& test : kCases) {
        TZmBitmap bitmap(4, 4, zm24RGB);
        bitmap.Fill(0.0);
        bitmap.AlphaFill(255);
        ASSERT_TRUE(bitmap.Resize(test.add, 0, 0, 0, 0.0, test.fill_alpha));
        EXPECT_EQ(bitmap.GetAlphaChannelRaw()->GetFull(), test.full);
    }
    TZmBitmap plain(2, 2, zm24RGB);
    plain.Fill(0.0);
    ASSERT_TRUE(plain.Resize(1, 1, 1, 1, 0.0, 0));
    EXPECT_FALSE(plain.HasAlphaChannel());
}

TEST(CanvasResize, RefusesWhatIsNoSize) {
    TZmBitmap bitmap(4, 3, zm8g);
    bitmap.Fill(5.0);
    int calls = 0;
    bitmap.SetOnChanged([&calls](void*) { ++calls; });
    for (const std::int32_t size : {0, -1, kMin}) {
        EXPECT_FALSE(bitmap.Resize(size, 3, 0.0, 255, zmhCenter, zmvTop));
        EXPECT_FALSE(bitmap.Resize(4, size, 0.0, 255, zmhCenter, zmvTop));
    }
    EXPECT_FALSE(bitmap.Resize(kMax, kMax, 0.0, 255, zmhRight, zmvBottom));
    EXPECT_FALSE(bitmap.Resize(-4, 0, 0, 0, 0.0, 255));
    EXPECT_FALSE(bitmap.Resize(kMin, kMin, kMax, kMax, 0.0, 255));
    EXPECT_FALSE(bitmap.Resize(kMax, kMax, kMax, kMax, 0.0, 255));
    EXPECT_TRUE(bitmap.Resize(4, 3, 0.0, 255, zmhRight, zmvBottom));  // the same size
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(bitmap.GetPixels_zm8(3, 2), 5);
    TZmBitmap empty;
    EXPECT_FALSE(empty.Resize(4, 4, 0.0, 255, zmhLeft, zmvTop));
    EXPECT_FALSE(empty.Resize(4, 4, 4, 4, 0.0, 255));
    TZmBitmap rendered;
    rendered.SetOnRenderVirtualPixel([](TZmBitmap*, std::int32_t, std::int32_t, void*) {});
    ASSERT_TRUE(rendered.Allocate(2, 2, zm8g));
    EXPECT_TRUE(rendered.Resize(7, 5, 0.0, 255, zmhCenter, zmvCenter));
    EXPECT_EQ(rendered.GetWidth(), 7);
    EXPECT_EQ(rendered.GetHeight(), 5);
}

TEST(MoveRegion, MovesPixelsAndAlpha) {
    struct TCase {
        std::int32_t x1, x2, dst;
        bool clear;
        TValues values;
    };
    const TCase kCases[] = {
        {1, 2, 3, true, {1, 9, 9, 2, 3}},    {1, 2, 3, false, {1, 2, 3, 2, 3}},
        {0, 2, 1, true, {9, 1, 2, 3, 5}},    {1, 3, 0, true, {2, 3, 4, 9, 5}},
        {-2, 1, 0, true, {9, 9, 1, 2, 5}},   {3, 9, 4, true, {1, 2, 3, 9, 4}},
        {0, 4, kMax, true, {9, 9, 9, 9, 9}}, {0, 4, kMin, false, {1, 2, 3, 4, 5}},
        {0, 4, -3, true, {4, 5, 9, 9, 9}},   {kMin, kMax, 0, true, {9, 9, 9, 9, 9}},
        {3, 2, 0, true, {1, 2, 3, 4, 5}},    {5, 8, 0, true, {1, 2, 3, 4, 5}},
    };
    for (const TCase& test : kCases) {
        SCOPED_TRACE(::testing::Message() << test.x1 << " to " << test.dst);
        ExpectLine({1, 2, 3, 4, 5}, test.values, 77, [&](TZmBitmap& bitmap, bool is_column) {
            is_column ? bitmap.MoveRegion(0, test.x1, 0, test.x2, 0, test.dst, 9.0, 77, test.clear)
                      : bitmap.MoveRegion(test.x1, 0, test.x2, 0, test.dst, 0, 9.0, 77, test.clear);
        });
    }
}

TEST(MoveRegion, OfASmallPlaneStaysInside) {
    TZmBitmap bitmap(8, 6, zm8g);
    bitmap.Fill(1.0);
    bitmap.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(3, 2, zmMemory));
    bitmap.AlphaFill(255);
    bitmap.SetAlpha(0, 0, 10);
    bitmap.MoveRegion(0, 0, 7, 5, 1, 1, 2.0, 60, true);
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 60);
    EXPECT_EQ(bitmap.GetAlpha(1, 1), 10);
    EXPECT_EQ(bitmap.GetPixels_zm8(0, 5), 2);
    EXPECT_EQ(bitmap.GetPixels_zm8(7, 5), 1);
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
}

TEST(CropAlpha, KeepsWhatIsVisible) {
    const auto bitmap = MakeGradient(zm24RGB, 9, 7);
    EXPECT_FALSE(bitmap->CropAlpha());  // no plane
    bitmap->AlphaFill(0);
    EXPECT_FALSE(bitmap->CropAlpha());  // nothing to see
    bitmap->SetAlpha(2, 5, 1);
    bitmap->SetAlpha(6, 3, 255);
    TZmBitmap expected(*bitmap);
    ASSERT_TRUE(expected.Crop(2, 3, 6, 5, 0));
    EXPECT_TRUE(bitmap->CropAlpha());
    ExpectSamePixels(expected, *bitmap);
    ExpectSameAlpha(expected, *bitmap);
    EXPECT_FALSE(bitmap->CropAlpha());  // nothing more to cut
    EXPECT_EQ(bitmap->GetWidth(), 5);
}

TEST(CropAlpha, CountsUncoveredPixelsAsVisible) {
    TZmBitmap bitmap(6, 5, zm8g);
    bitmap.Fill(0.0);
    bitmap.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(4, 5, zmMemory));
    bitmap.AlphaFill(0);
    bitmap.SetAlpha(1, 2, 9);
    EXPECT_TRUE(bitmap.CropAlpha());
    EXPECT_EQ(bitmap.GetWidth(), 5);
    EXPECT_EQ(bitmap.GetHeight(), 5);
    TZmBitmap large(2, 2, zm8g);
    large.Fill(0.0);
    large.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(9, 9, zmMemory));
    EXPECT_FALSE(large.CropAlpha());
    large.AlphaFill(0);
    large.GetAlphaChannelRaw()->SetPixels_zm8(8, 8, 255);
    EXPECT_FALSE(large.CropAlpha());
}

// Construction.

TEST(Construction, FromAPlatformBitmapCopies) {
    TBitmap platform;
    ASSERT_TRUE(platform.SetSize(4, 3, pf8bit));
    for (std::int32_t y = 0; y < 3; ++y) {
        for (std::int32_t x = 0; x < 4; ++x) {
            platform.GetScanLine(y)[x] = static_cast<std::uint8_t>(10 * y + x);
        }
    }
    platform.ColorTable()[12] = TRGB{1, 2, 3};
    TZmBitmap whole(platform);
    TZmBitmap part(platform, TRect{1, 1, 4, 3});
    platform.GetScanLine(1)[2] = 0;
    EXPECT_EQ(whole.GetPixelFormat(), zm8p);
    EXPECT_NE(whole.GetLocation(), zmTBitmap);
    EXPECT_EQ(whole.GetPixels_zm8(2, 1), 12);
    EXPECT_EQ(whole.GetPixels(2, 1), (TRGB{1, 2, 3}));
    EXPECT_EQ(part.GetWidth(), 3);
    EXPECT_EQ(part.GetHeight(), 2);
    EXPECT_EQ(part.GetPixels_zm8(0, 0), 11);
    EXPECT_EQ(part.GetPixels_zm8(2, 1), 23);
    TBitmap none;
    TZmBitmap empty(none);
    EXPECT_TRUE(empty.IsEmpty());
    TZmBitmap outside(platform, TRect{3, 3, 1, 9});
    EXPECT_TRUE(outside.IsEmpty());
}

TEST(Construction, FromMemoryBorrowsIt) {
    std::vector<std::uint8_t> memory(2 * 8);
    memory[0] = 5;
    memory[8] = 6;
    {
        TZmBitmap bitmap(memory.data(), 2, 2, zm24RGB);
        EXPECT_EQ(bitmap.GetPixels_zm24RGB(0, 0), (TRGB{5, 0, 0}));  // the top row comes first
        EXPECT_EQ(bitmap.GetPixels_zm24RGB(0, 1), (TRGB{6, 0, 0}));
        bitmap.SetPixels_zm24RGB(1, 1, TRGB{7, 8, 9});
    }
    EXPECT_EQ(memory[13], 9);
    EXPECT_TRUE(TZmBitmap(nullptr, 2, 2, zm8g).IsEmpty());
    EXPECT_TRUE(TZmBitmap(memory.data(), 0, 2, zm8g).IsEmpty());
}

TEST(Construction, FromAFileLoadsIt) {
    const TempFolder folder;
    const auto saved = MakeGradient(zm24RGB, 5, 4);
    ASSERT_TRUE(saved->Write(folder.Name("a.bmp"), nullptr));
    TZmBitmap loaded(folder.Name("a.bmp"), nullptr);
    ExpectSamePixels(*saved, loaded);
    EXPECT_EQ(loaded.GetFilename(), folder.Name("a.bmp"));
    WriteFileBytes(folder.File("c.bmp"), {1, 2, 3});
    TZmBitmap broken(folder.Name("c.bmp"), nullptr);
    EXPECT_TRUE(broken.IsEmpty());
    EXPECT_THROW(TZmBitmap(folder.Name("none.bmp"), nullptr), EFOpenError);
}

}  // namespace
}  // namespace zm::test
