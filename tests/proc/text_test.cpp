// Text on bitmaps: where it goes, what it covers, what stays.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>

#include "engine/canvas/zmgdiplus.h"
#include "engine/proc/zalmoproc.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr TColor kWhite = 0xFFFFFF;
constexpr TColor kRed = 0x0000FF;
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();

TFont FontOf(std::int32_t points, TColor color = kWhite) {
    TFont font;
    font.SetSize(points);
    font.Color = color;
    return font;
}

TPoint SizeOf(const std::u16string& text, const TFont& font) {
    TZmEmptyCanvas canvas;
    canvas.GetFont() = font;
    return canvas.MeasureText(text);
}

std::unique_ptr<TZmBitmap> MakeBlack(std::int32_t width, std::int32_t height,
                                     TZmPixelFormat format = zm24RGB) {
    auto bitmap = std::make_unique<TZmBitmap>(width, height, format);
    bitmap->Fill(TRGBA{});
    return bitmap;
}

/// Bounds of what differs from `before`; right and bottom exclusive, empty when nothing does.
TRect ChangedRect(TZmBitmap& before, TZmBitmap& after) {
    TRect ink{after.GetWidth(), after.GetHeight(), 0, 0};
    for (std::int32_t y = 0; y < after.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < after.GetWidth(); ++x) {
            const bool is_inside = x < before.GetWidth() && y < before.GetHeight();
            const TRGB old = is_inside ? before.GetPixels(x, y) : TRGB{};
            if (after.GetPixels(x, y) != old) {
                ink = {std::min(ink.left, x), std::min(ink.top, y), std::max(ink.right, x + 1),
                       std::max(ink.bottom, y + 1)};
            }
        }
    }
    return ink;
}

TRect InkOf(TZmBitmap& image) {
    return ChangedRect(*MakeBlack(image.GetWidth(), image.GetHeight()), image);
}

TEST(TextTest, KeywordsOfBothAxes) {
    const TFont font = FontOf(18);
    const TPoint size = SizeOf(u"Hill", font);
    const std::int32_t width = 239;   // margin 11
    const std::int32_t height = 105;  // margin 5
    struct TCase {
        std::int32_t keyword;
        std::int32_t x, y;
    };
    const TCase cases[] = {
        {TextPosMargin, 11, 5},
        {TextPosCenter, (width - size.x) / 2, (height - size.y) / 2},
        {TextPosFarMargin, width - size.x - 11, height - size.y - 5},
        {TextPosEnd, width - size.x, height - size.y},
        {0, 0, 0},
        {-905, -905, -905},
    };
    const auto draw = [&](std::int32_t x, std::int32_t y) {
        auto image = MakeBlack(width, height);
        TZalmoProc(image.get()).TextOut(x, y, u"Hill", font, 0, true, false);
        return image;
    };
    for (const TCase& row : cases) {
        ExpectSamePixels(*draw(row.x, 0), *draw(row.keyword, 0));
        ExpectSamePixels(*draw(0, row.y), *draw(0, row.keyword));
    }
    const TRect start = InkOf(*draw(0, 0));
    const TRect end = InkOf(*draw(TextPosEnd, TextPosEnd));
    EXPECT_EQ(end.left - start.left, width - size.x);
    EXPECT_EQ(end.bottom - start.bottom, height - size.y);
    EXPECT_LE(end.right, width);

    // Centred in less room than it takes: the half of a negative number, truncated toward zero.
    const std::int32_t narrow = size.x - 3;
    auto centred = MakeBlack(narrow, height);
    auto wanted = MakeBlack(narrow, height);
    TZalmoProc(centred.get()).TextOut(TextPosCenter, 0, u"Hill", font, 0, true, false);
    TZalmoProc(wanted.get()).TextOut(-1, 0, u"Hill", font, 0, true, false);
    ExpectSamePixels(*wanted, *centred);
}

TEST(TextTest, AnAngleTurnsAboutTheCornerCounterClockwise) {
    const TFont font = FontOf(18);
    const TPoint size = SizeOf(u"Hill", font);
    const auto ink_at = [&](std::int32_t angle) {
        auto image = MakeBlack(300, 300);
        TZalmoProc(image.get()).TextOut(150, 150, u"Hill", font, angle, true, false);
        return InkOf(*image);
    };
    const TRect up = ink_at(90);
    EXPECT_GE(up.left, 150);
    EXPECT_LE(up.right, 150 + size.y);
    EXPECT_GE(up.top, 150 - size.x);
    EXPECT_LE(up.bottom, 151);
    const TRect back = ink_at(180);
    EXPECT_GE(back.left, 150 - size.x - 1);
    EXPECT_LE(back.bottom, 151);
    const TRect down = ink_at(-90);
    EXPECT_GE(down.left, 150 - size.y);
    EXPECT_LE(down.right, 151);
    EXPECT_GE(down.top, 150);
    const TRect full = ink_at(450);
    EXPECT_EQ(full.top, up.top);
    EXPECT_EQ(full.right, up.right);
    for (const std::int32_t angle : {kMin, kMax, 45, -30}) {
        EXPECT_GT(ink_at(angle).right, 0) << angle;
    }
    // The keyword counts with the turned box, whose sides have changed places.
    auto image = MakeBlack(200, 300);
    auto wanted = MakeBlack(200, 300);
    TZalmoProc(image.get()).TextOut(TextPosEnd, 200, u"Hill", font, 90, true, false);
    TZalmoProc(wanted.get()).TextOut(200 - size.y, 200, u"Hill", font, 90, true, false);
    ExpectSamePixels(*wanted, *image);
}

TEST(TextTest, AnImageGrowsToTheText) {
    const TFont font = FontOf(18);
    const TPoint size = SizeOf(u"A wide text", font);
    for (const TZmPixelFormat format : {zm1g, zm8p, zm8g, zm16g, zm24RGB, zm32RGB}) {
        auto image = MakeBlack(20, 200, format);
        if (format == zm8p) {
            image->SetPalette(7, {255, 255, 255});
        }
        auto small = MakeBlack(20, 200, format);
        TZalmoProc proc(image.get());
        proc.SetBackground(kWhite);
        proc.TextOut(0, 0, u"A wide text", font, 0, true, true);
        EXPECT_EQ(image->GetWidth(), size.x) << "format " << int{format};
        EXPECT_EQ(image->GetHeight(), 200);
        EXPECT_EQ(image->GetPixels(5, 190), TRGB{}) << "format " << int{format};
        EXPECT_EQ(image->GetPixels(size.x - 1, 190), (TRGB{255, 255, 255}))
            << "format " << int{format};
        EXPECT_FALSE(image->HasAlphaChannel());
    }
    auto turned = MakeBlack(20, 10);
    turned->AlphaFill(255);
    turned->SetAlpha(0, 0, 99);
    TZalmoProc(turned.get()).TextOut(0, 0, u"A wide text", font, 90, true, true);
    EXPECT_EQ(turned->GetWidth(), size.y);
    EXPECT_EQ(turned->GetHeight(), size.x);
    EXPECT_EQ(turned->GetAlpha(size.y - 1, size.x - 1), 99) << "the corner's alpha";
    EXPECT_EQ(turned->GetAlpha(19, 9), 255);

    auto large = MakeBlack(size.x + 1, size.y + 1);
    TZalmoProc(large.get()).TextOut(0, 0, u"A wide text", font, 0, true, true);
    EXPECT_EQ(large->GetWidth(), size.x + 1);
    // Keywords count with the grown image.
    auto grown = MakeBlack(1, 1);
    TZalmoProc(grown.get()).TextOut(TextPosEnd, TextPosEnd, u"A wide text", font, 0, true, true);
    EXPECT_EQ(InkOf(*grown).left, InkOf(*large).left);
}

TEST(TextTest, OverTransparentPixelsCoverageBecomesAlpha) {
    auto image = MakeBlack(120, 40);
    image->Fill(0x00FF00);
    image->AlphaFill(0);
    TZalmoProc(image.get()).TextOut(2, 2, u"Edge", FontOf(20, kRed), 0, true, false);
    bool has_partial = false;
    bool has_opaque = false;
    for (std::int32_t y = 0; y < 40; ++y) {
        for (std::int32_t x = 0; x < 120; ++x) {
            const std::uint8_t alpha = image->GetAlpha(x, y);
            const TRGB pixel = image->GetPixels(x, y);
            EXPECT_EQ(pixel, alpha == 0 ? (TRGB{0, 255, 0}) : (TRGB{0, 0, 255})) << x << ", " << y;
            has_partial = has_partial || (alpha > 0 && alpha < 255);
            has_opaque = has_opaque || alpha == 255;
        }
    }
    EXPECT_TRUE(has_partial) << "no smooth edges";
    EXPECT_TRUE(has_opaque);
}

TEST(TextTest, WithoutAntialiasingPixelsAreWholeAndThePlaneStays) {
    auto image = MakeBlack(120, 40);
    AddNoiseAlpha(*image, 5);
    TZmBitmap before(*image);
    TZalmoProc(image.get()).TextOut(2, 2, u"Edge", FontOf(20, kRed), 0, false, false);
    std::int32_t count = 0;
    for (std::int32_t y = 0; y < 40; ++y) {
        for (std::int32_t x = 0; x < 120; ++x) {
            const TRGB pixel = image->GetPixels(x, y);
            EXPECT_TRUE(pixel == TRGB{} || pixel == (TRGB{0, 0, 255})) << x << ", " << y;
            count += pixel == TRGB{} ? 0 : 1;
        }
    }
    EXPECT_GT(count, 100);
    ExpectSameAlpha(before, *image);
}

TEST(TextTest, TheCanvasFontKeepsAllButTheColour) {
    auto image = MakeBlack(60, 40);
    image->GetCanvasFont().Color = 0x123456;
    const std::int32_t height = image->GetCanvasFont().Height;
    TZalmoProc proc(image.get());
    proc.TextOut(0, 0, u"x", u"", 0, kRed, fsBold | fsItalic, 0, true, false);
    EXPECT_EQ(image->GetCanvasFont().Name, u"Tahoma") << "an empty name is none";
    EXPECT_EQ(image->GetCanvasFont().Height, height) << "as is a size of 0";
    EXPECT_EQ(image->GetCanvasFont().Style, fsBold | fsItalic);
    EXPECT_EQ(image->GetCanvasFont().Color, 0x123456);
    proc.TextOut(0, 0, u"x", u"DejaVu Serif", 20, kRed, 0, 0, true, false);
    EXPECT_EQ(image->GetCanvasFont().Name, u"DejaVu Serif");
    EXPECT_EQ(image->GetCanvasFont().GetSize(), 20);
    EXPECT_EQ(image->GetCanvasFont().Style, 0);
    EXPECT_EQ(image->GetCanvasFont().Color, 0x123456);
    EXPECT_EQ(image->GetLocation(), zmTBitmap) << "where its canvas is";
}

TEST(TextTest, RectanglesWrapTheText) {
    const TFont font = FontOf(12);
    const TPoint line = SizeOf(u"several words", font);
    auto image = MakeBlack(200, 200);
    TZalmoProc(image.get())
        .TextOut(TRect{20, 30, 20 + line.x + 4, 190}, u"several words several words several words",
                 font, 0);
    const TRect ink = InkOf(*image);
    EXPECT_GE(ink.left, 19);
    EXPECT_LE(ink.right, 20 + line.x + 5);
    EXPECT_GE(ink.top, 30);
    EXPECT_GT(ink.bottom, 30 + 2 * line.y) << "three lines";
    EXPECT_LE(ink.bottom, 30 + 3 * line.y + 2);

    auto turned = MakeBlack(200, 200);
    TZalmoProc(turned.get()).TextOut(TRect{50, 60, 130, 140}, u"words", font, 90);
    const TRect inside = InkOf(*turned);
    EXPECT_GT(inside.right, inside.left);
    EXPECT_GE(inside.left, 50);
    EXPECT_GE(inside.top, 60);
    EXPECT_LE(inside.right, 131);
    EXPECT_LE(inside.bottom, 141);
}

/// A gradient in a place, written on; what no glyph covers keeps its bytes, at full depth.
void ExpectTextInPlace(TZmPixelFormat format, TZmLocation location, bool anti_alias) {
    SCOPED_TRACE("format " + std::to_string(format) + ", place " + std::to_string(location) +
                 (anti_alias ? ", smooth" : ""));
    TZmBitmap image;
    image.SetMinFileSize(location == zmFile ? 0 : 1 << 20);
    image.SetLocation(location);
    image.Assign(MakeGradient(format, 90, 50).get());
    TZmBitmap before(image);
    TZalmoProc(&image).TextOut(20, 10, u"MM", FontOf(16), 0, anti_alias, false);
    EXPECT_EQ(image.GetPixelFormat(), format);
    EXPECT_EQ(image.GetLocation(), zmTBitmap);
    const TRect ink = ChangedRect(before, image);
    EXPECT_GE(ink.left, 19);
    EXPECT_GT(ink.right, 35);
    EXPECT_LE(ink.bottom, 40);
    TZmBitmap top(image, TRect{0, 0, 90, 9});
    TZmBitmap top_before(before, TRect{0, 0, 90, 9});
    ExpectSamePixels(top_before, top);
}

TEST(TextTest, AllFormatsAndPlacesTakeText) {
    constexpr TZmPixelFormatSet kPlatformFormats(zm1g, zm8p, zm8g, zm24RGB, zm32RGB);
    for (int ordinal = zm1g; ordinal <= zm32RGB; ++ordinal) {
        const auto format = static_cast<TZmPixelFormat>(ordinal);
        for (const TZmLocation location : {zmMemory, zmFile, zmTBitmap}) {
            for (const bool anti_alias : {true, false}) {
                if (kPlatformFormats.Contains(format)) {
                    ExpectTextInPlace(format, location, anti_alias);
                }
            }
        }
    }
    auto words = MakeGradient(zm16g, 90, 50);
    TZalmoProc(words.get()).TextOut(20, 10, u"MM", FontOf(16), 0, true, false);
    EXPECT_EQ(words->GetPixelFormat(), zm8g) << "as platform bitmaps have it";
    for (const TZmPixelFormat format : {zm32f, zmCMYK, zm48RGB, zmCIELab}) {
        const auto deep = MakeGradient(format, 90, 50);
        TZmBitmap before(*deep);
        TZalmoProc proc(deep.get());
        EXPECT_THROW(proc.TextOut(20, 10, u"MM", FontOf(16), 0, true, false), EZmException);
        ExpectSamePixels(before, *deep);
    }
}

TEST(TextTest, TheCutRegionGivesThePixelsOfTheWholeOne) {
    // Marks stacked far beyond the line's box; italics that lean out of it.
    std::u16string stacked = u"Zo";
    for (int i = 0; i < 30; ++i) {
        stacked += u'\u0302';
    }
    for (const std::u16string& text : {stacked, std::u16string(u"fjord")}) {
        TFont font = FontOf(20);
        font.Style = fsItalic;
        auto image = MakeBlack(400, 900);
        TZalmoProc(image.get()).TextOut(100, 700, text, font, 0, true, false);
        auto wanted = MakeBlack(400, 900);
        auto canvas = wanted->CreateROICanvas({0, 0, 400, 900}, true, true, true);
        canvas->GetFont() = font;
        canvas->DrawText(text, 100, 700, 0);
        canvas.reset();
        ExpectSamePixels(*wanted, *image);
    }
}

TEST(TextTest, UndoAndTheEnd) {
    auto image = MakeGradient(zm24RGB, 60, 40);
    TZmBitmap before(*image);
    TZalmoProc proc(image.get());
    proc.SetAutoUndo(true);
    int finished = 0;
    proc.SetOnFinishWork([&](void*) { ++finished; });
    proc.TextOut(0, 0, u"text", FontOf(12), 0, true, false);
    EXPECT_EQ(finished, 1);
    ASSERT_EQ(proc.GetUndoCount(), 1);
    EXPECT_EQ(proc.GetUndoInfo(0)->Operation, 93);
    EXPECT_EQ(proc.GetUndoInfo(0)->Caption, u"Insert Text");
    proc.Undo(false);
    ExpectSamePixels(before, *image);

    TZmBitmap empty;
    TZalmoProc(&empty).TextOut(0, 0, u"text", FontOf(12), 0, true, true);
    EXPECT_TRUE(empty.IsEmpty());
    TZalmoProc detached(static_cast<TZmBitmap*>(nullptr));
    EXPECT_THROW(detached.TextOut(0, 0, u"x", u"", 0, 0, 0, 0, true, false), EZmException);
}

TEST(TextTest, HostileRequestsEndCleanly) {
    auto image = MakeGradient(zm24RGB, 90, 50);
    TZmBitmap before(*image);
    TZalmoProc proc(image.get());
    const std::u16string long_name(10000, u'n');
    const std::u16string surrogates = {0xD800, u'a', 0xDC00, 0xDBFF, 0xD83D, 0xDE00, 0xDFFF};
    proc.TextOut(0, 0, surrogates, long_name, 12, kWhite, 0, 0, true, false);
    EXPECT_NE(ChangedRect(before, *image).right, 0);
    for (const std::int32_t size : {0, -1, kMin, 1, 5000, kMax}) {
        proc.TextOut(0, 0, u"text", u"DejaVu Sans", size, kWhite, 255, 0, true, false);
        proc.TextOut(TRect{0, 0, 90, 50}, u"text", u"DejaVu Sans", size, kWhite, 255, 33);
    }
    for (const std::int32_t height : {kMin, kMax, 0}) {
        TFont font = FontOf(12);
        font.Height = height;
        proc.TextOut(0, 0, u"text", font, 45, true, false);
    }
    image->Assign(&before);
    for (const std::int32_t place : {kMin, kMin + 1, -100000, 100000, kMax - 1, kMax}) {
        for (const std::int32_t angle : {0, 90, 45}) {
            proc.TextOut(place, 0, u"text", FontOf(12), angle, true, false);
            proc.TextOut(0, place, u"text", FontOf(12), angle, false, false);
            proc.TextOut(TRect{place, place, place, place}, u"text", FontOf(12), angle);
        }
    }
    proc.TextOut(TRect{0, 0, kMin, kMin}, u"", FontOf(12), 0);
    proc.TextOut(0, 0, u"", FontOf(12), 0, true, true);
    ExpectSamePixels(before, *image);
    proc.TextOut(TRect{kMin, kMin, kMax, kMax}, u"text", FontOf(12), 0);
    proc.TextOut(TRect{kMin, kMin, kMax, kMax}, u"text", FontOf(12), 45);
    proc.TextOut(TRect{40, 30, 10, 5}, u"corners the other way round", FontOf(12), 20);
}

TEST(TextTest, AMillionCharacters) {
    auto image = MakeBlack(300, 100);
    std::u16string text;
    while (text.size() < 1000000) {
        text += u"lorem ipsum ";
    }
    TZalmoProc(image.get()).TextOut(0, 0, text, FontOf(12), 0, true, false);
    EXPECT_GT(InkOf(*image).right, 290) << "the line begins at the left and leaves at the right";
    auto wrapped = MakeBlack(300, 100);
    TZalmoProc(wrapped.get()).TextOut(TRect{0, 0, 300, 100}, text, FontOf(12), 0);
    EXPECT_GT(InkOf(*wrapped).bottom, 80);
}

}  // namespace
}  // namespace zm::test
