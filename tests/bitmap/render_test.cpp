#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <limits>
#include <memory>
#include <vector>

#include "engine/bitmap/zmrender_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "tests/bitmap/render_support.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

using test::AddNoiseAlpha;
using test::ExpectSamePixels;
using test::kUntouched;
using test::kWhite;
using test::MakeFilled;
using test::MakeMap;
using test::MakeNoise;

constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();

/// Draws one source pixel over one destination pixel.
struct TOnePixel {
    TRGB source = kWhite;
    TRGB dest = {};
    int alpha = -1;  // -1: no plane
    bool enable_alpha = true;
    int transparency = 255;
    double opacity = 1;
    TZmRenderOperation operation = zmlNormal;
    bool is_full = false;
};

TRGB DrawOnePixel(const TOnePixel& sample) {
    auto source = MakeFilled(1, 1, sample.source);
    auto dest = MakeFilled(1, 1, sample.dest);
    if (sample.alpha >= 0) {
        source->AlphaFill(sample.alpha);
        source->GetAlphaChannel()->SetFull(sample.is_full);
    }
    source->RenderToTZmBitmapEx(dest.get(), 0, 0, 1, 1, 0, 0, 1, 1, sample.enable_alpha,
                                sample.transparency, rfNone, sample.operation, sample.opacity);
    return dest->GetPixels_zm24RGB(0, 0);
}

// Rectangles. One axis a row: destination position and size, source position and size on images
// of 16 pixels; then how many destination columns stay untouched on the left, and the source
// columns that are shown from there on.

struct TAxisCase {
    const char* name;
    std::int32_t dest, dest_size, source, source_size, skipped;
    std::vector<int> columns;
};

const std::vector<int> kSixteen = {0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15};
const std::vector<TAxisCase> kAxisCases = {
    {"whole", 0, 16, 0, 16, 0, kSixteen},
    {"left of the destination", -10, 16, 0, 16, 0, {10, 11, 12, 13, 14, 15}},
    {"over its right edge", 12, 16, 0, 16, 12, {0, 1, 2, 3}},
    {"left of the source", 0, 16, -12, 16, 12, {0, 1, 2, 3}},
    {"over the source's right edge", 0, 16, 10, 16, 0, {10, 11, 12, 13, 14, 15}},
    {"enlarged", 3, 6, 5, 3, 3, {5, 5, 6, 6, 7, 7}},
    {"enlarged by a fraction", 0, 5, 0, 3, 0, {0, 0, 1, 1, 2}},
    {"shrunk", 0, 4, 2, 12, 0, {2, 5, 8, 11}},
    // -5 * 0.5 = 2.5 goes to the even 2: the table then runs from column 2 in halves.
    {"enlarged, half a pixel cut", -5, 16, 0, 8, 0, {2, 2, 3, 3, 4, 4, 5, 5, 6, 6, 7}},
    // 3 / 2 = 1.5 goes to the even 2.
    {"shrunk, left of the source", 0, 8, -3, 16, 2, {0, 2, 4, 6, 8, 10}},
    {"shrunk, over the source's right edge", 0, 8, 6, 16, 0, {6, 8, 10, 12, 14}},
    {"beside the destination", 16, 4, 0, 4, 0, {}},
    {"beside the source", 0, 4, 16, 4, 0, {}},
    {"no source size", 0, 4, 0, 0, 0, {}},
    {"negative size", 8, -4, 0, 4, 0, {}},
    {"far to the left", kMin, 16, 0, 16, 0, {}},
    {"far to the right", kMax, 16, 0, 16, 0, {}},
    {"source far to the left", 0, 16, kMin, 16, 0, {}},
    {"largest sizes", 0, kMax, 0, kMax, 0, kSixteen},
};

TEST(Render, ClipsColumnsAndRows) {
    for (const TAxisCase& test : kAxisCases) {
        auto across = MakeFilled(16, 2, kUntouched);
        auto down = MakeFilled(2, 16, kUntouched);
        MakeMap(16, 2)->RenderToTZmBitmapEx(across.get(), test.dest, 0, test.dest_size, 2,
                                            test.source, 0, test.source_size, 2, true, 255, rfNone,
                                            zmlNormal, 1.0);
        MakeMap(2, 16)->RenderToTZmBitmapEx(down.get(), 0, test.dest, 2, test.dest_size, 0,
                                            test.source, 2, test.source_size, true, 255, rfNone,
                                            zmlNormal, 1.0);
        for (std::int32_t i = 0; i < 16; ++i) {
            const auto index = static_cast<std::size_t>(i - test.skipped);
            const bool is_drawn = i >= test.skipped && index < test.columns.size();
            const auto from = static_cast<std::uint8_t>(is_drawn ? test.columns[index] : 0);
            ASSERT_EQ(is_drawn ? (TRGB{from, 1, 77}) : kUntouched, across->GetPixels(i, 1))
                << test.name << ", column " << i;
            ASSERT_EQ(is_drawn ? (TRGB{1, from, 77}) : kUntouched, down->GetPixels(1, i))
                << test.name << ", row " << i;
        }
    }
}

TEST(Render, UpdateRectangleExcludesRightAndBottom) {
    auto source = MakeMap(8, 8);
    auto dest = MakeFilled(8, 8, kUntouched);
    for (const TZmRenderOperation operation : {zmlNormal, zmlMAX}) {  // copy, tables
        dest->Fill(static_cast<double>(ColorFromRGB(kUntouched)));
        const TRect update{2, 3, 5, 4};
        source->RenderToTZmBitmap(dest.get(), nullptr, nullptr, &update, 1, 1, 7, 7, 0, 0, 7, 7,
                                  true, false, 255, rfNone, true, operation, 1.0);
        for (std::int32_t y = 0; y < 8; ++y) {
            for (std::int32_t x = 0; x < 8; ++x) {
                const bool is_inside = x >= 2 && x < 5 && y == 3;
                const TRGB color = dest->GetPixels_zm24RGB(x, y);
                EXPECT_EQ(is_inside ? 77 : 3, color.r) << x << ", " << y;
                EXPECT_EQ(is_inside ? std::max(x - 1, operation == zmlMAX ? 1 : 0) : 1, color.b);
            }
        }
    }
}

TEST(Render, UpdateRectanglesBesideTheDrawingDrawNothing) {
    auto source = MakeMap(8, 8);
    auto dest = MakeFilled(16, 16, kUntouched);
    for (const TRect& update : {TRect{12, 0, 16, 16}, TRect{-9, 0, -1, 16}, TRect{0, 12, 16, 16},
                                TRect{5, 0, 2, 16}, TRect{kMax, kMax, kMin, kMin}}) {
        for (const TResampleFilter filter : {rfNone, rfBilinear}) {
            const std::int32_t size = filter == rfNone ? 8 : 7;
            source->RenderToTZmBitmap(dest.get(), nullptr, nullptr, &update, 0, 0, size, size, 0, 0,
                                      8, 8, true, false, 255, filter, true, zmlNormal, 1.0);
        }
    }
    ExpectSamePixels(*MakeFilled(16, 16, kUntouched), *dest);
}

// Tables.

TEST(Render, TablesAreBuiltReusedAndFreed) {
    auto source = MakeMap(16, 4);
    auto dest = MakeFilled(16, 4, kUntouched);
    TZmLookupTable columns;
    TZmLookupTable rows;
    const auto draw = [&](const TRect* update, bool free_tables) {
        source->RenderToTZmBitmap(dest.get(), &columns, &rows, update, 4, 0, 8, 4, 0, 0, 16, 4,
                                  true, false, 255, rfNone, free_tables, zmlNormal, 1.0);
    };
    draw(nullptr, /*free_tables=*/false);
    EXPECT_EQ((TZmLookupTable{0, 2, 4, 6, 8, 10, 12, 14}), columns);
    EXPECT_EQ((TZmLookupTable{0, 1, 2, 3}), rows);

    // A caller's own table: used from the first visible column on, entries outside limited.
    columns = {9, 9, -5, 1000, 3, 9, 9, 9};
    const TRect update{6, 0, 9, 4};
    draw(&update, /*free_tables=*/false);
    EXPECT_EQ(2, dest->GetPixels_zm24RGB(5, 0).b);
    EXPECT_EQ(0, dest->GetPixels_zm24RGB(6, 0).b);
    EXPECT_EQ(15, dest->GetPixels_zm24RGB(7, 0).b);
    EXPECT_EQ(3, dest->GetPixels_zm24RGB(8, 0).b);
    EXPECT_EQ(10, dest->GetPixels_zm24RGB(9, 0).b);

    columns.resize(3);  // too short to be used
    draw(nullptr, /*free_tables=*/true);
    EXPECT_EQ(14, dest->GetPixels_zm24RGB(11, 3).b);
    EXPECT_TRUE(columns.empty() && rows.empty());
}

TEST(Render, SolidBackgroundCopiesTheRowAbove) {
    auto source = MakeMap(2, 2);
    auto dest = MakeFilled(2, 4, TRGB{});
    dest->SetPixels_zm24RGB(0, 1, TRGB{100, 100, 100});  // breaks what the caller asserts
    source->RenderToTZmBitmap(dest.get(), nullptr, nullptr, nullptr, 0, 0, 2, 4, 0, 0, 2, 2, true,
                              /*SolidBackground=*/true, 255, rfNone, true, zmlAdd, 1.0);
    EXPECT_EQ((TRGB{0, 0, 77}), dest->GetPixels_zm24RGB(0, 1));
    EXPECT_EQ((TRGB{1, 1, 77}), dest->GetPixels_zm24RGB(1, 3));
}

// Alpha. White over black shows the weight: 255 * weight / 256.

TEST(Render, WeightsOfAlphaTransparencyAndOpacity) {
    struct TCase {
        const char* name;
        TOnePixel sample;
        int expected;
    };
    const std::vector<TCase> cases = {
        {"nothing to blend", {}, 255},
        {"opacity counts twice without a plane", {.opacity = 0.5}, 62},  // 63 * 255 / 256
        {"opacity 0", {.opacity = 0.0}, 0},
        {"transparency without a plane", {.transparency = 128}, 127},
        {"both without a plane", {.transparency = 128, .opacity = 0.5}, 31},  // 64, then 32
        {"plane of 255 that is not full", {.alpha = 255}, 254},
        {"full plane", {.alpha = 255, .is_full = true}, 255},
        {"full plane under opacity", {.alpha = 255, .opacity = 0.5, .is_full = true}, 126},
        {"plane under a ceiling", {.alpha = 200, .transparency = 128}, 127},
        {"plane below the ceiling", {.alpha = 100, .transparency = 128}, 99},
        {"plane and opacity", {.alpha = 201, .opacity = 0.5}, 99},  // 100.5 truncated
        {"plane that is not asked for", {.alpha = 0, .enable_alpha = false}, 255},
        {"opacity without the plane", {.alpha = 0, .enable_alpha = false, .opacity = 0.5}, 62},
        {"alpha 0", {.alpha = 0}, 0},
        {"transparency limited", {.alpha = 200, .transparency = 1000}, 199},
        {"negative transparency", {.transparency = -1}, 0},
        {"opacity limited", {.alpha = 200, .opacity = 7.0}, 199},
        {"opacity not a number", {.opacity = std::numeric_limits<double>::quiet_NaN()}, 0},
        {"towards black rounds down",
         {.source = TRGB{}, .dest = kWhite, .alpha = 127},
         128},  // 255 - 126.5
    };
    for (const TCase& sample : cases) {
        EXPECT_EQ(sample.expected, DrawOnePixel(sample.sample).g) << sample.name;
    }
}

TEST(Render, OperationComesBeforeTheMixing) {
    const TRGB plain =
        DrawOnePixel({.source = {100, 0, 30}, .dest = {50, 9, 250}, .operation = zmlAdd});
    EXPECT_EQ((TRGB{150, 9, 255}), plain);
    const TRGB mixed = DrawOnePixel(
        {.source = {100, 0, 30}, .dest = {50, 9, 250}, .alpha = 128, .operation = zmlAdd});
    EXPECT_EQ((TRGB{100, 9, 252}), mixed);  // half of the way to the sum, rounded down
}

TEST(Render, StereoOperationsCountDestinationRowsByTheirLowByte) {
    auto source = MakeFilled(1, 4, kWhite);
    auto dest = MakeFilled(1, 260, TRGB{});
    source->RenderToTZmBitmapEx(dest.get(), 0, 255, 1, 4, 0, 0, 1, 4, true, 255, rfNone,
                                zmlStereoEven, 1.0);
    for (std::int32_t y = 255; y < 259; ++y) {
        EXPECT_EQ(y % 2 == 0 ? 255 : 0, dest->GetPixels_zm24RGB(0, y).g) << y;
    }
}

TEST(Render, PlaneSmallerThanItsImageEndsOpaque) {
    for (const double opacity : {1.0, 0.5}) {
        auto source = MakeFilled(40, 3, kWhite);
        source->ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(20, 2, zmMemory));
        source->GetAlphaChannel()->Fill(0.0);
        auto dest = MakeFilled(40, 3, TRGB{});
        source->RenderToTZmBitmapEx(dest.get(), 0, 0, 40, 3, 0, 0, 40, 3, true, 255, rfNone,
                                    zmlNormal, opacity);
        const int opaque = opacity == 1.0 ? 254 : 126;
        EXPECT_EQ(0, dest->GetPixels_zm24RGB(19, 1).g);
        EXPECT_EQ(opaque, dest->GetPixels_zm24RGB(20, 1).g);
        EXPECT_EQ(opaque, dest->GetPixels_zm24RGB(0, 2).g);
    }
}

// Formats.

TEST(Render, ReadsEveryFormat) {
    struct TCase {
        TZmPixelFormat format;
        std::vector<std::uint8_t> bytes;
        TRGB expected;
    };
    const std::vector<TCase> cases = {
        {zm1g, {0x80}, kWhite},
        {zm1g, {0x7F}, TRGB{}},
        {zm8p, {7}, TRGB{30, 20, 10}},
        {zm8g, {99}, TRGB{99, 99, 99}},
        {zm16g, {0xFF, 0x12}, TRGB{0x12, 0x12, 0x12}},
        {zm24RGB, {1, 2, 3}, TRGB{1, 2, 3}},
        {zm32f, {0, 0, 0, 0x3F}, TRGB{127, 127, 127}},          // 0.5
        {zm32f, {0, 0, 0xC0, 0x7F}, TRGB{}},                    // not a number
        {zm32f, {0, 0, 0, 0x40}, kWhite},                       // 2.0
        {zmCMYK, {255, 51, 0, 100}, TRGB{0, 20, 100}},          // K * amount / 255
        {zm48RGB, {0xFF, 1, 0xFF, 2, 0xFF, 3}, TRGB{3, 2, 1}},  // red first
        {zmCIELab, {255, 0, 0}, kWhite},
        {zm32RGB, {1, 2, 3, 0}, TRGB{1, 2, 3}},  // its alpha does not act
    };
    for (const TCase& sample : cases) {
        TZmBitmap source(1, 1, sample.format);
        source.SetPalette(7, TRGB{30, 20, 10});
        std::memcpy(source.GetScanLine(0), sample.bytes.data(), sample.bytes.size());
        auto dest = MakeFilled(1, 1, TRGB{50, 50, 50});
        source.DrawToTZmBitmap(dest.get(), 0, 0);
        EXPECT_EQ(sample.expected, dest->GetPixels_zm24RGB(0, 0))
            << PixelFormatInfo(sample.format).name;
    }
}

TEST(Render, GraysTakeTheDisplayRange) {
    struct TCase {
        TZmPixelFormat format;
        double black, white, value;
        int expected;
    };
    const std::vector<TCase> cases = {
        {zm8g, 10, 20, 15, 127},     {zm8g, 10, 20, 5, 0},          {zm8g, 10, 20, 25, 255},
        {zm8g, 20, 10, 12, 204},  // from white to black
        {zm8g, 10.5, 20.5, 10, 0},   {zm16g, 0, 4095, 4095, 255},   {zm16g, 0, 4095, 2048, 127},
        {zm16g, 1000, 3000, 500, 0}, {zm32f, 0.25, 0.75, 0.5, 127}, {zm32f, 0.25, 0.75, 0.9, 255},
        {zm32f, -1, 1, 0, 127},
    };
    for (const TCase& sample : cases) {
        TZmBitmap source(1, 1, sample.format);
        source.Fill(sample.value);
        source.SetBlackValue(sample.black);
        source.SetWhiteValue(sample.white);
        auto dest = MakeFilled(1, 1, TRGB{50, 50, 50});
        source.DrawToTZmBitmap(dest.get(), 0, 0);
        EXPECT_EQ(sample.expected, dest->GetPixels_zm24RGB(0, 0).g)
            << PixelFormatInfo(sample.format).name << " " << sample.value;
        EXPECT_EQ(sample.white, source.GetWhiteValue());  // rendering does not use it up
    }
}

TEST(Render, ColorsTakeTheDisplayAdjustments) {
    struct TCase {
        const char* name;
        std::int32_t red_offset;
        bool enable;
        std::int32_t contrast;
        double black, white;
        int value, expected_red, expected_green;
    };
    const std::vector<TCase> cases = {
        {"none", 0, false, 0, 0, 0, 100, 100, 100},
        {"offset", 10, true, 0, 0, 0, 100, 110, 100},
        {"offset over the end", 300, true, 0, 0, 0, 100, 255, 100},
        {"offset that is off", 10, false, 0, 0, 0, 100, 100, 100},
        {"offset off beside contrast", 10, false, 10, 0, 0, 100, 72, 72},
        {"contrast doubled", 0, false, 10, 0, 0, 200, 255, 255},
        {"contrast halved", 0, false, -25, 0, 0, 255, 191, 191},
        {"contrast rounds towards 0", 0, false, -25, 0, 0, 1, 65, 65},  // -63.5 gives -63
        {"offset before contrast", 10, true, 10, 0, 0, 100, 92, 72},
        {"flat", 0, false, -100, 0, 0, 7, 128, 128},
        {"range", 0, false, 0, 50, 150, 100, 127, 127},
        {"range, ends", 0, false, 0, 50, 150, 40, 0, 0},
        {"contrast before range", 0, false, 10, 50, 150, 100, 56, 56},  // 72: 22 / 100
        {"largest values", kMax, true, kMax, 0, 0, 100, 255, 0},
        {"smallest values", kMin, true, kMin, 0, 0, 100, 255, 255},
    };
    for (const TCase& sample : cases) {
        for (const TZmPixelFormat format : {zm24RGB, zm48RGB}) {
            TZmBitmap source(1, 1, format);
            const auto value = static_cast<std::uint8_t>(sample.value);
            source.Fill(TRGBA{value, value, value, 255});
            source.SetChannelOffset(0, sample.red_offset);
            source.SetEnableChannelOffset(sample.enable);
            source.SetContrast(sample.contrast);
            source.SetBlackValue(sample.black);
            source.SetWhiteValue(sample.white);
            auto dest = MakeFilled(1, 1, TRGB{50, 50, 50});
            source.DrawToTZmBitmap(dest.get(), 0, 0);
            const TRGB color = dest->GetPixels_zm24RGB(0, 0);
            EXPECT_EQ(sample.expected_red, color.r) << sample.name;
            EXPECT_EQ(sample.expected_green, color.g) << sample.name;
        }
    }
}

// Destinations and entries.

TEST(Render, DestinationsWithoutRoomForColorsStayAsTheyAre) {
    auto source = MakeFilled(40, 4, kWhite);
    for (const TZmPixelFormat format : {zm1g, zm8p, zm8g, zm16g}) {
        TZmBitmap dest(40, 4, format);
        dest.Fill(0.0);
        source->DrawToTZmBitmap(&dest, 0, 0);
        EXPECT_EQ(0, dest.GetScanLine(1)[0]) << PixelFormatInfo(format).name;
    }
    TZmBitmap empty;
    source->DrawToTZmBitmap(&empty, 0, 0);
    source->DrawToTZmBitmap(nullptr, 0, 0);
    auto dest = MakeFilled(2, 2, kUntouched);
    empty.DrawToTZmBitmap(dest.get(), 0, 0);
    EXPECT_EQ(kUntouched, dest->GetPixels_zm24RGB(0, 0));
}

TEST(Render, LeavesTheDestinationsPlaneAndTellsOfTheChange) {
    auto source = MakeFilled(2, 2, kWhite);
    auto dest = MakeFilled(2, 2, TRGB{});
    dest->AlphaFill(9);
    int changes = 0;
    dest->SetOnChanged([&changes](void*) { ++changes; });
    source->DrawToTZmBitmap(dest.get(), 1, 1);
    EXPECT_EQ(9, dest->GetAlpha(1, 1));
    EXPECT_EQ(1, changes);
}

TEST(Render, DrawsRectanglesIntoPlatformBitmaps) {
    auto source = MakeMap(4, 4);
    TBitmap dest;
    ASSERT_TRUE(dest.SetSize(4, 4, pf24bit));
    source->RenderToTBitmapEx(&dest, 1, 1, 2, 2, 2, 2, 2, 2, true, 255, rfNone, zmlNormal, 1.0);
    EXPECT_EQ(77, dest.GetScanLine(1)[5]);
    EXPECT_EQ(0, dest.GetScanLine(0)[2]);
    source->RenderToTBitmap(&dest, nullptr, nullptr, nullptr, 0, 0, 1, 1, 3, 0, 1, 1, true, false,
                            255, rfNone, true, zmlNormal, 1.0);
    EXPECT_EQ(3, dest.GetScanLine(0)[0]);
    auto scaled = MakeFilled(4, 4, kUntouched);
    source->DrawToTZmBitmap(scaled.get(), TRect{0, 0, 4, 2}, TRect{0, 0, 2, 2}, rfNone);
    EXPECT_EQ((TRGB{1, 1, 77}), scaled->GetPixels_zm24RGB(3, 1));
    source->DrawToTZmBitmap(scaled.get(), 2, 3, TRect{1, 0, 3, 1});
    EXPECT_EQ((TRGB{2, 0, 77}), scaled->GetPixels_zm24RGB(3, 3));
}

TEST(Render, DrawsAnImageIntoItselfFromTheTop) {
    for (const std::int64_t limit : {std::int64_t{1} << 40, std::int64_t{0}}) {  // memory, file
        for (const double opacity : {1.0, 0.999}) {
            TZmBitmap bitmap;
            bitmap.SetMinFileSize(limit);
            bitmap.Assign(MakeMap(8, 8).get());
            ASSERT_EQ(limit == 0 ? zmFile : zmMemory, bitmap.GetLocation());
            bitmap.RenderToTZmBitmapEx(&bitmap, 2, 0, 6, 8, 0, 0, 6, 8, false, 255, rfNone,
                                       zmlNormal, opacity);
            if (opacity == 1.0) {  // the copy moves whole runs
                EXPECT_EQ(5, bitmap.GetPixels_zm24RGB(7, 3).b);
                bitmap.RenderToTZmBitmapEx(&bitmap, 0, 1, 8, 7, 0, 0, 8, 7, false, 255, rfNone,
                                           zmlNormal, 1.0);
                EXPECT_EQ(0, bitmap.GetPixels_zm24RGB(7, 7).g);  // each row reads the one above
            } else {  // 253 / 256 of what was written two pixels before: 0 goes on and on
                EXPECT_EQ(0, bitmap.GetPixels_zm24RGB(2, 3).b);
                EXPECT_EQ(0, bitmap.GetPixels_zm24RGB(6, 3).b);
            }
        }
    }
}

// The two forms of the row loops.

struct TLoopCase {
    std::int32_t transparency;
    double opacity;
    bool use_plane;
    std::int32_t ratio_q1;  // source columns per destination column, with one fractional bit
};

constexpr TLoopCase kLoopCases[] = {
    {255, 1.0, true, 2}, {255, 0.5, true, 2},  {200, 0.77, true, 2},    {255, 0.31, false, 2},
    {90, 1.0, false, 2}, {255, 1.0, true, 1},  {140, 0.6, true, 3},     {255, 0.9, false, 4},
    {0, 1.0, true, 2},   {255, 1e-9, true, 2}, {17, 0.999999, true, 2},
};

/// Rows of zm24RGB with guard bytes around the whole.
class TGuardedImage {
public:
    TGuardedImage(std::int32_t width, std::int32_t height)
        : bytes_(static_cast<std::size_t>((width * 3 + 3) / 4 * 4 * height) + 128, 0x5A) {
        for (std::size_t i = 64; i < bytes_.size() - 64; ++i) {
            bytes_[i] = static_cast<std::uint8_t>(i * i / 7);
        }
        bitmap_.EncapsulateMemory(bytes_.data() + 64, width, height, zm24RGB, false, zmboTOPLEFT);
    }
    TZmBitmap& Get() { return bitmap_; }
    const std::vector<std::uint8_t>& Bytes() const { return bytes_; }

private:
    std::vector<std::uint8_t> bytes_;
    TZmBitmap bitmap_;
};

using TTransferRoutine = void (TZmBitmapRendering::*)(const TZmRenderTransfer&);
struct TRoutinePair {
    TZmPixelFormat format;
    TTransferRoutine transfer;
    TTransferRoutine blend;
};
constexpr TRoutinePair kRoutines[] = {
    {zm1g, &TZmBitmap::TransferPixels_zm1g, &TZmBitmap::BlendPixels_zm1g},
    {zm8p, &TZmBitmap::TransferPixels_zm8p, &TZmBitmap::BlendPixels_zm8p},
    {zm8g, &TZmBitmap::TransferPixels_zm8g, &TZmBitmap::BlendPixels_zm8g},
    {zm16g, &TZmBitmap::TransferPixels_zm16g, &TZmBitmap::BlendPixels_zm16g},
    {zm24RGB, &TZmBitmap::TransferPixels_zm24RGB, &TZmBitmap::BlendPixels_zm24RGB},
    {zm32f, &TZmBitmap::TransferPixels_zm32f, &TZmBitmap::BlendPixels_zm32f},
    {zmCMYK, &TZmBitmap::TransferPixels_zmCMYK, &TZmBitmap::BlendPixels_zmCMYK},
    {zm48RGB, &TZmBitmap::TransferPixels_zm48RGB, &TZmBitmap::BlendPixels_zm48RGB},
    {zmCIELab, &TZmBitmap::TransferPixels_zmCIELab, &TZmBitmap::BlendPixels_zmCIELab},
    {zm32RGB, &TZmBitmap::TransferPixels_zm32RGB, &TZmBitmap::BlendPixels_zm32RGB},
};

/// Draws `source` at column 1 by the plain loop, the fast loop and the generic routine.
void CompareLoops(TZmBitmap& source, const TRoutinePair& routines, const TLoopCase& sample,
                  std::int32_t width, TZmRenderOperation operation) {
    std::vector<std::int32_t> columns;
    for (std::int32_t x = 0; x < width; ++x) {
        columns.push_back(std::min(1 + x * sample.ratio_q1 / 2, source.GetWidth() - 1));
    }
    const std::vector<std::int32_t> rows = {1, 0};
    const std::vector<std::uint8_t> row_alpha(
        static_cast<std::size_t>(source.GetWidth()),
        static_cast<std::uint8_t>(sample.transparency * sample.opacity));
    for (const bool is_blending : {false, true}) {
        TGuardedImage images[3] = {{width + 2, 4}, {width + 2, 4}, {width + 2, 4}};
        for (int i = 0; i < 3; ++i) {
            TZmRenderTransfer transfer{&images[i].Get(), TRect{1, 1, width + 1, 3}};
            transfer.columns = columns.data();
            transfer.rows = rows.data();
            transfer.plane = sample.use_plane ? source.GetAlphaChannelRaw() : nullptr;
            transfer.row_alpha = row_alpha.data();
            transfer.transparency = sample.transparency;
            transfer.operation = operation;
            transfer.opacity = sample.opacity;
            transfer.loop = i == 1 ? TRenderLoop::kFast : TRenderLoop::kPlain;
            if (i == 2) {
                is_blending ? source.BlendPixels_any(transfer)
                            : source.TransferPixels_any(transfer);
            } else {
                (source.*(is_blending ? routines.blend : routines.transfer))(transfer);
            }
        }
        ASSERT_TRUE(images[0].Bytes() == images[1].Bytes())
            << PixelFormatInfo(routines.format).name << ", width " << width << ", operation "
            << int{operation} << ", blending " << is_blending;
        ASSERT_TRUE(images[0].Bytes() == images[2].Bytes())
            << "generic, " << PixelFormatInfo(routines.format).name << ", width " << width;
    }
}

TEST(Render, FastLoopsEqualPlainOnesAtEveryWidth) {
    for (const TRoutinePair& routines : kRoutines) {
        auto source = MakeNoise(routines.format, 90, 2, 5);
        AddNoiseAlpha(*source, 6);
        const bool is_slow = routines.format == zmCIELab;
        for (std::int32_t width = 1; width <= 70; width += is_slow ? 23 : 1) {
            for (const TLoopCase& sample : kLoopCases) {
                CompareLoops(*source, routines, sample, width,
                             width % 3 == 0 ? zmlScreen : zmlNormal);
            }
        }
    }
}

TEST(Render, FastLoopsEqualPlainOnesInEveryOperation) {
    auto source = MakeNoise(zm24RGB, 90, 2, 7);
    AddNoiseAlpha(*source, 8);
    for (int operation = 0; operation < kRenderOperationCount; ++operation) {
        for (const TLoopCase& sample : kLoopCases) {
            CompareLoops(*source, kRoutines[4], sample, 53,
                         static_cast<TZmRenderOperation>(operation));
        }
    }
}

}  // namespace
}  // namespace zm
