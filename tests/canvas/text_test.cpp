#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <thread>
#include <vector>

#include "tests/canvas/drawing.h"

namespace zm {
namespace {

using test::kRed;
using test::TDrawing;

constexpr std::int32_t kEm = 20;

void SetFont(TZmCanvas& canvas, std::int32_t em, TFontStyles style = 0) {
    canvas.GetFont().Name = u"DejaVu Sans";
    canvas.GetFont().Height = -em;
    canvas.GetFont().Color = kRed;
    canvas.GetFont().Style = style;
}

std::int32_t WidthOf(const TRect& rect) {
    return rect.right - rect.left;
}
std::int32_t HeightOf(const TRect& rect) {
    return rect.bottom - rect.top;
}

TEST(CanvasText, FontSizesInPoints) {
    TFont font;
    font.SetSize(12);
    EXPECT_EQ(font.Height, -16);
    EXPECT_EQ(font.GetSize(), 12);
    font.SetSize(48);
    EXPECT_EQ(font.Height, -64);
    font.SetSize(std::numeric_limits<std::int32_t>::max());
    EXPECT_EQ(font.Height, std::numeric_limits<std::int32_t>::min());
}

TEST(CanvasText, SizesGrowWithTextAndFont) {
    TZmEmptyCanvas canvas;
    SetFont(canvas, kEm);
    EXPECT_EQ(canvas.MeasureText(u"").x, 0);
    EXPECT_EQ(canvas.MeasureText(u"").y, 0);
    const TPoint one = canvas.MeasureText(u"mmmm");
    const TPoint two = canvas.MeasureText(u"mmmmmmmm");
    EXPECT_GT(one.x, 2 * kEm);
    EXPECT_NEAR(two.x, 2 * one.x, 1) << "nothing is added around";
    EXPECT_EQ(two.y, one.y);
    EXPECT_GE(one.y, kEm);
    EXPECT_LE(one.y, 2 * kEm);
    EXPECT_NEAR(canvas.MeasureText(u"mmmm\r\nmmmm\nm").y, 3 * one.y, 2);
    SetFont(canvas, 4 * kEm);
    // Widths may be fitted to whole pixels glyph by glyph.
    EXPECT_NEAR(canvas.MeasureText(u"mmmm").x, 4 * one.x, 0.03 * 4 * one.x);
    SetFont(canvas, kEm);
    canvas.SetTypographicDrawText(false);
    EXPECT_GT(canvas.MeasureText(u"mmmm").x, one.x);
}

TEST(CanvasText, SizesDoNotDependOnWhatWasDrawnBefore) {
    TZmEmptyCanvas canvas;
    for (const std::int32_t em : {9, 13, 17}) {
        SetFont(canvas, em);
        canvas.SetTextRendering(zmtrTextRenderingHintAntiAliasGridFit);
        canvas.MeasureText(u"m");
        canvas.SetTextRendering(zmtrTextRenderingHintAntiAlias);
        const TPoint after = canvas.MeasureText(u"m\nm\nm\nm\nm");
        SetFont(canvas, 40);
        canvas.MeasureText(u"m");
        SetFont(canvas, em);
        EXPECT_EQ(canvas.MeasureText(u"m\nm\nm\nm\nm").y, after.y) << em;
    }
}

TEST(CanvasText, PositiveHeightsAreThoseOfALine) {
    TZmEmptyCanvas canvas;
    SetFont(canvas, kEm);
    canvas.GetFont().Height = 100;
    EXPECT_NEAR(canvas.MeasureText(u"m").y, 100, 2);
    canvas.GetFont().Height = 0;
    EXPECT_GT(canvas.MeasureText(u"m").y, 8);
}

TEST(CanvasText, MeasuresTurnedAndWrapped) {
    TZmEmptyCanvas canvas;
    SetFont(canvas, kEm);
    const std::u16string text = u"mmmm mmmm mmmm";
    const TPoint size = canvas.MeasureText(text);
    EXPECT_EQ(canvas.MeasureText(text, 90).x, size.y);
    EXPECT_EQ(canvas.MeasureText(text, -90).y, size.x);
    EXPECT_EQ(canvas.MeasureText(text, 180).x, size.x);
    const double side = std::sqrt(0.5) * (size.x + size.y);
    EXPECT_NEAR(canvas.MeasureText(text, 45).x, side, 0.51);
    const TRect narrow{0, 0, size.x / 2, 1000};
    const TPoint wrapped = canvas.MeasureText(text, narrow, 0);
    EXPECT_LE(wrapped.x, size.x / 2 + 1);
    EXPECT_GE(wrapped.y, 2 * size.y - 2);
    // A word that is wider than the box breaks too.
    EXPECT_GE(canvas.MeasureText(u"mmmmmmmmmmmm", TRect{0, 0, 3 * kEm, 1000}, 0).y, 4 * size.y - 4);
}

TEST(CanvasText, DrawsWithinItsMeasuredBox) {
    TDrawing drawing(200, 80);
    SetFont(*drawing.zm_canvas, kEm);
    const std::u16string text = u"HxH";
    const TPoint size = drawing.zm_canvas->MeasureText(text);
    drawing.zm_canvas->DrawText(text, 40, 30, 0);
    const TRect ink = drawing.InkBounds();
    EXPECT_GE(ink.left, 40);
    EXPECT_GE(ink.top, 30);
    EXPECT_LE(ink.right, 40 + size.x);
    EXPECT_LE(ink.bottom, 30 + size.y);
    // Capitals of this font are 0.729 em high; 24 would be too far from it for any other.
    EXPECT_NEAR(HeightOf(ink), kEm * 3 / 4, 2);
    EXPECT_GT(WidthOf(ink), size.x / 2);
    // Coverage goes to the alpha byte alone: every pixel keeps the colour.
    int partial = 0;
    for (std::int32_t y = ink.top; y < ink.bottom; ++y) {
        for (std::int32_t x = ink.left; x < ink.right; ++x) {
            const TRGBA pixel = drawing.PixelAt(x, y);
            partial += pixel.a != 0 && pixel.a != 255 ? 1 : 0;
            if (pixel.a != 0) {
                ASSERT_EQ(drawing.ColorAt(x, y), 0xFF0000U) << x << ", " << y;
            }
        }
    }
    EXPECT_GT(partial, 5);
    const TRect touched = drawing.zm_canvas->GetTouchedRect();
    EXPECT_LE(touched.left, ink.left);
    EXPECT_GE(touched.bottom, ink.bottom);
}

TEST(CanvasText, TurnsAboutItsCorner) {
    TDrawing drawing(200, 200);
    SetFont(*drawing.zm_canvas, kEm);
    const TPoint size = drawing.zm_canvas->MeasureText(u"HHHH");
    drawing.zm_canvas->DrawText(u"HHHH", 100, 100, -90);  // runs upward, to the right of x
    const TRect ink = drawing.InkBounds();
    EXPECT_GE(ink.left, 100);
    EXPECT_LE(ink.right, 100 + size.y);
    EXPECT_LE(ink.bottom, 100);
    EXPECT_GE(ink.top, 100 - size.x - 1);
    EXPECT_GT(HeightOf(ink), WidthOf(ink));
}

TEST(CanvasText, TurnedInARectangleIsClippedToIt) {
    TDrawing drawing(200, 200);
    SetFont(*drawing.zm_canvas, kEm);
    drawing.zm_canvas->DrawText(u"HHHHHHHHHHHH", TRect{50, 50, 120, 120}, 30);
    const TRect ink = drawing.InkBounds();
    EXPECT_GE(ink.left, 85) << "begins at the middle";
    EXPECT_LE(ink.right, 120);
    EXPECT_LE(ink.bottom, 120);
    EXPECT_GT(WidthOf(ink), 10);
    drawing.zm_canvas->FillRect(TRect{0, 0, 10, 10});
    EXPECT_NE(drawing.PixelAt(2, 2).a, 0) << "neither clip nor transform stays";
}

/// The bottom of the ink of three lines within a height of so many tenths of a line.
std::int32_t InkBottom(std::int32_t tenths, bool is_typographic) {
    TDrawing drawing(100, 120);
    SetFont(*drawing.zm_canvas, kEm);
    const std::int32_t line = drawing.zm_canvas->MeasureText(u"H").y;
    drawing.zm_canvas->SetTypographicDrawText(is_typographic);
    drawing.zm_canvas->DrawText(u"HH\nHH\nHH", TRect{5, 0, 95, line * tenths / 10});
    return drawing.CoveredArea() > 0 ? drawing.InkBounds().bottom : 0;
}

TEST(CanvasText, HeightsLimitTheLines) {
    const std::int32_t line = InkBottom(10, true) > 0 ? kEm * 6 / 5 : 0;
    ASSERT_GT(line, 0);
    // Typographic text has whole lines only, other text is cut through at the end of the box.
    EXPECT_EQ(InkBottom(4, true), 0);
    EXPECT_EQ(InkBottom(8, true), 0);
    EXPECT_EQ(InkBottom(18, true), InkBottom(10, true));
    EXPECT_NEAR(InkBottom(28, true), InkBottom(18, true) + line, 2);
    EXPECT_NEAR(InkBottom(4, false), line * 4 / 10, 1);
    EXPECT_NEAR(InkBottom(16, false), line * 16 / 10, 1);
    EXPECT_EQ(InkBottom(35, false), InkBottom(35, true));
}

TEST(CanvasText, StylesChangeThePixels) {
    double area[5];
    TRect ink[5];
    const TFontStyles kStyles[] = {0, fsBold, fsItalic, fsUnderline, fsStrikeOut};
    for (std::size_t i = 0; i < 5; ++i) {
        TDrawing drawing(200, 80);
        SetFont(*drawing.zm_canvas, 2 * kEm, kStyles[i]);
        drawing.zm_canvas->DrawText(u"HH", 20, 10, 0);
        area[i] = drawing.CoveredArea();
        ink[i] = drawing.InkBounds();
    }
    EXPECT_GT(area[1], 1.2 * area[0]);
    EXPECT_NE(ink[2].right, ink[0].right);
    EXPECT_GT(ink[3].bottom, ink[0].bottom);
    EXPECT_GT(area[4], area[0]);
    EXPECT_EQ(ink[4].bottom, ink[0].bottom);
}

TEST(CanvasText, SingleBitTextHasNoPartialCoverage) {
    TDrawing drawing(200, 80);
    SetFont(*drawing.zm_canvas, kEm);
    drawing.zm_canvas->SetTextRendering(zmtrTextRenderingHintSingleBitPerPixel);
    drawing.zm_canvas->DrawText(u"Sample", 5, 5, 0);
    EXPECT_GT(drawing.CoveredArea(), 50);
    EXPECT_TRUE(drawing.IsAllOrNothing());
}

TEST(CanvasText, BrushTransparencyIsTheTexts) {
    TDrawing drawing(100, 60);
    SetFont(*drawing.zm_canvas, 2 * kEm);
    drawing.zm_canvas->GetBrush().SetTransparency(100);
    drawing.zm_canvas->DrawText(u"\u2588", 20, 5, 0);  // a full block
    EXPECT_EQ(drawing.PixelAt(30, 25), (TRGBA{0, 0, 255, 100}));
}

TEST(CanvasText, AllOfUnicodeDrawsSomething) {
    const std::u16string kTexts[] = {
        u"a\u0301\u0323",             // combining marks
        u"\u05E9\u05DC\u05D5\u05DD",  // right to left
        u"\u0645\u0631\u062D\u0628\u0627",
        u"\U0001F600",                 // emoji
        std::u16string(1, u'\xD800'),  // unpaired surrogates
        std::u16string(u"a\xDC00"
                       u"b"),
    };
    for (const std::u16string& text : kTexts) {
        TDrawing drawing(200, 80);
        SetFont(*drawing.zm_canvas, 2 * kEm);
        drawing.zm_canvas->DrawText(text, 20, 10, 0);
        EXPECT_GT(drawing.CoveredArea(), 10);
        EXPECT_GT(drawing.zm_canvas->MeasureText(text).x, 5);
    }
}

TEST(CanvasText, MissingFontsAreReplaced) {
    for (const std::u16string& name :
         {std::u16string(u"No Such Font At All"), std::u16string(10000, u'x'),
          std::u16string(u"a\xD800\0,;\"", 7), std::u16string()}) {
        TDrawing drawing(100, 60);
        SetFont(*drawing.zm_canvas, kEm);
        drawing.zm_canvas->GetFont().Name = name;
        drawing.zm_canvas->DrawText(u"Text", 10, 10, 0);
        EXPECT_GT(drawing.CoveredArea(), 20);
    }
}

TEST(CanvasText, SizesAndPlacesWithoutBounds) {
    constexpr std::int32_t kLow = std::numeric_limits<std::int32_t>::min();
    constexpr std::int32_t kHigh = std::numeric_limits<std::int32_t>::max();
    for (const std::int32_t height : {kLow, kHigh, 1, -1, 0, -80000, -100000}) {
        TDrawing drawing(50, 50);
        SetFont(*drawing.zm_canvas, kEm);
        drawing.zm_canvas->GetFont().Height = height;
        EXPECT_GE(drawing.zm_canvas->MeasureText(u"Text").x, 0);
        drawing.zm_canvas->DrawText(u"Text", 0, 0, 0);
        drawing.zm_canvas->DrawText(u"Text", -20000, -60000, 0);
        drawing.zm_canvas->DrawText(u"Text", TRect{kLow, kLow, kHigh, kHigh}, 33);
    }
    for (const std::int32_t place : {kLow, kHigh}) {
        TDrawing drawing(50, 50);
        SetFont(*drawing.zm_canvas, kEm);
        drawing.zm_canvas->DrawText(u"Text", place, 10, 0);
        drawing.zm_canvas->DrawText(u"Text", 10, place, 45);
        drawing.zm_canvas->DrawText(u"Text", TRect{place, place, 10, 10});
        EXPECT_EQ(drawing.CoveredArea(), 0);
    }
}

TEST(CanvasText, VeryLongTextsEnd) {
    TDrawing drawing(100, 60);
    SetFont(*drawing.zm_canvas, kEm);
    std::u16string words;
    while (words.size() < 1000000) {
        words += u"words and ";
    }
    EXPECT_GT(drawing.zm_canvas->MeasureText(words).x, 1000000);
    drawing.zm_canvas->DrawText(words, 10, 10, 0);
    drawing.zm_canvas->DrawText(std::u16string(1000000, u'x'), TRect{0, 0, 100, 60});
    drawing.zm_canvas->DrawText(std::u16string(1000000, u'\n') + u"x", 0, 0, 0);
    EXPECT_GT(drawing.CoveredArea(), 100);
}

TEST(CanvasText, ThreadsDrawAtTheSameTime) {
    const auto draw = [] {
        TDrawing drawing(200, 60);
        SetFont(*drawing.zm_canvas, kEm, fsBold);
        drawing.zm_canvas->DrawText(u"Threads \u05E9\u05DC", 5, 5, 10);
        return drawing.CoveredArea();
    };
    const double expected = draw();
    std::vector<std::thread> threads;
    std::vector<double> areas(8);
    for (double& area : areas) {
        threads.emplace_back([&area, &draw] {
            for (int i = 0; i < 5; ++i) {
                area = draw();
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(areas, std::vector<double>(8, expected));
}

TEST(CanvasText, PlatformText) {
    TDrawing drawing(200, 80, pf24bit, /*anti_alias=*/true, /*use_library=*/false);
    SetFont(*drawing.zm_canvas, kEm);
    const TPoint size = drawing.zm_canvas->TextExtent(u"Sample");
    EXPECT_GT(size.x, 2 * kEm);
    EXPECT_GT(size.y, kEm);
    drawing.zm_canvas->TextOut(10, 10, u"Sample");
    EXPECT_EQ(drawing.ColorAt(10, 10), 0x0000FFU) << "the box behind it";
    EXPECT_EQ(drawing.ColorAt(10 + size.x, 10), 0U);
    drawing.zm_canvas->GDITextOut2(10, 45, u"Sample");
    const TRect ink = drawing.InkBounds();
    EXPECT_GT(ink.bottom, 50);
    drawing.zm_canvas->TextRect(TRect{150, 60, 155, 70}, 100, 60, u"Sample Sample");
    EXPECT_EQ(drawing.ColorAt(149, 65), 0U);
    drawing.zm_canvas->GDITextRectEx(TRect{100, 0, 200, 40}, u"Hi",
                                     {platform::tpFar, platform::tpCenter, false});
    EXPECT_EQ(drawing.ColorAt(120, 20), 0U);
}

}  // namespace
}  // namespace zm
