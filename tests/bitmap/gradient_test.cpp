#include <gtest/gtest.h>

#include <cstring>
#include <limits>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "tests/bitmap/place_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr TZmGradientDirection kDirections[] = {zmgHorizontal, zmgVertical, zmgDiagonal,
                                                zmgDiagonal2};
constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
constexpr TColor kWhite = 0x00FFFFFF;

TEST(GradientFill, GoesAStraightLineInEachFormat) {
    struct TCase {
        TZmPixelFormat format;
        TColor start, end;
        std::vector<std::uint8_t> bytes;  // three pixels
    };
    const TCase kCases[] = {
        // red 0, green 0, blue 10 to red 200, green 5, blue 0; the middles 100, 2.5, 5
        {zm24RGB, 0x0A0000, 0x0005C8, {10, 0, 0, 5, 2, 100, 0, 5, 200}},
        {zm32RGB, 0x0A0000, 0x0005C8, {10, 0, 0, 255, 5, 2, 100, 255, 0, 5, 200, 255}},
        {zm8g, 0, 0xFEFEFE, {0, 127, 254}},
        {zm8g, kWhite, 0, {255, 128, 0}},  // 127.5, to even
        {zm16g, 0, kWhite, {0, 0, 0, 0x80, 0xFF, 0xFF}},
        {zm48RGB, 0, 0x0000FF, {0, 0, 0, 0, 0, 0, 0, 0x80, 0, 0, 0, 0, 0xFF, 0xFF, 0, 0, 0, 0}},
        {zm32f, 0, kWhite, {0, 0, 0, 0, 0, 0, 0, 0x3F, 0, 0, 0x80, 0x3F}},
        {zm1g, 0, 0xFEFEFE, {0x20}},  // grey 127 is black
        {zm1g, 0, kWhite, {0x60}},
    };
    for (const TCase& test : kCases) {
        TZmBitmap bitmap(3, 1, test.format);
        bitmap.Fill(0.0);
        bitmap.GradientFill(test.start, test.end, zmgHorizontal);
        const std::uint8_t* const row = bitmap.GetScanLine(0);
        EXPECT_EQ(std::vector<std::uint8_t>(row, row + test.bytes.size()), test.bytes)
            << PixelFormatInfo(test.format).name;
    }
}

TEST(GradientFill, TakesSignedChannelsAndPaletteColours) {
    TZmBitmap ends(2, 1, zmCIELab);
    ends.GradientFill(0x00FF00, 0xFF00FF, zmgHorizontal);
    const TCIELab green = ends.GetPixels_zmCIELab(0, 0);
    const TCIELab magenta = ends.GetPixels_zmCIELab(1, 0);
    ASSERT_LT(green.a, 0);
    ASSERT_GT(magenta.a, 0);
    TZmBitmap lab(3, 1, zmCIELab);
    lab.GradientFill(0x00FF00, 0xFF00FF, zmgHorizontal);
    EXPECT_NEAR(lab.GetPixels_zmCIELab(1, 0).l, (green.l + magenta.l) / 2.0, 0.5);
    EXPECT_NEAR(lab.GetPixels_zmCIELab(1, 0).a, (green.a + magenta.a) / 2.0, 0.5);
    EXPECT_NEAR(lab.GetPixels_zmCIELab(1, 0).b, (green.b + magenta.b) / 2.0, 0.5);
    TZmBitmap indexed(5, 1, zm8p);
    indexed.SetPalette(3, TRGB{255, 255, 255});
    indexed.SetPalette(7, TRGB{120, 120, 120});
    indexed.GradientFill(0, kWhite, zmgHorizontal);
    const std::uint8_t* const row = indexed.GetScanLine(0);
    // greys 0, 64, 128, 191, 255; 64 is nearer to 120 than to 0, 191 nearer to 255
    EXPECT_EQ(std::vector<std::uint8_t>(row, row + 5), (std::vector<std::uint8_t>{0, 7, 7, 3, 3}));
}

TEST(GradientFill, RunsInFourDirections) {
    struct TCase {
        TZmGradientDirection direction;
        std::vector<std::uint8_t> values;  // 3 x 2 pixels
    };
    const TCase kCases[] = {{zmgHorizontal, {0, 60, 120, 0, 60, 120}},
                            {zmgVertical, {0, 0, 0, 120, 120, 120}},
                            {zmgDiagonal, {0, 40, 80, 40, 80, 120}},
                            {zmgDiagonal2, {80, 40, 0, 120, 80, 40}}};
    for (const TCase& test : kCases) {
        TZmBitmap bitmap(3, 2, zm8g);
        bitmap.GradientFill(0, 0x787878, test.direction);
        for (std::int32_t i = 0; i < 6; ++i) {
            EXPECT_EQ(bitmap.GetPixels_zm8(i % 3, i / 3), test.values[static_cast<std::size_t>(i)])
                << int{test.direction} << " pixel " << i;
        }
        TZmBitmap point(1, 1, zm8g);
        point.GradientFill(0x333333, kWhite, test.direction);
        EXPECT_EQ(point.GetPixels_zm8(0, 0), 0x33);
    }
}

TEST(GradientFillRect, ShowsAWindowOfTheWholeRectangle) {
    constexpr TRect kRects[] = {
        {-4, -3, 20, 12}, {2, 1, 6, 4}, {9, 0, 9, 5}, {-7, 2, 3, 2}, {5, 3, 90, 90}};
    for (const TZmPixelFormat format : kAllFormats) {
        for (const TZmGradientDirection direction : kDirections) {
            for (const TRect& rect : kRects) {
                // The same rectangle on a canvas that holds all of it.
                TZmBitmap whole(rect.right - rect.left + 1, rect.bottom - rect.top + 1, format);
                const auto bitmap = MakeNoise(format, 11, 7, 3);
                bitmap->CopyPaletteTo(&whole);
                whole.GradientFill(0x00C81E05, 0x000A90FF, direction);
                TZmBitmap expected(*bitmap);
                whole.CopyRectTo(&expected, 0, 0, rect.left, rect.top, whole.GetWidth(),
                                 whole.GetHeight(), false);
                bitmap->GradientFillRect(rect.left, rect.top, rect.right, rect.bottom, 0x00C81E05,
                                         0x000A90FF, direction);
                ExpectSamePixels(expected, *bitmap);
            }
        }
    }
}

TEST(GradientFillRect, TakesAnyRectangle) {
    for (const TZmGradientDirection direction : kDirections) {
        TZmBitmap bitmap(3, 2, zm8g);
        bitmap.Fill(7.0);
        bitmap.GradientFillRect(2, 0, 1, 1, 0, kWhite, direction);
        bitmap.GradientFillRect(0, 1, 2, 0, 0, kWhite, direction);
        bitmap.GradientFillRect(3, 2, kMax, kMax, 0, kWhite, direction);
        bitmap.GradientFillRect(kMin, kMin, -1, -1, 0, kWhite, direction);
        EXPECT_EQ(bitmap.GetPixels_zm8(2, 1), 7);
        bitmap.GradientFillRect(kMin, kMin, kMax, kMax, 0, 0xFEFEFE, direction);
        EXPECT_EQ(bitmap.GetPixels_zm8(1, 1), 127);  // the middle of all numbers
        TZmBitmap empty;
        empty.GradientFill(0, kWhite, direction);
        EXPECT_TRUE(empty.IsEmpty());
    }
}

}  // namespace
}  // namespace zm::test
