#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>

#include "engine/foundation/zmsettings.h"
#include "tests/canvas/drawing.h"

namespace zm {
namespace {

using test::kBlue;
using test::kRed;
using test::TDrawing;

constexpr std::uint32_t kRedPixel = 0xFF0000;
constexpr std::uint32_t kBluePixel = 0x0000FF;

TEST(CanvasShapes, FillRectLeavesTheLastColumnAndRow) {
    TDrawing drawing(12, 12);
    drawing.zm_canvas->FillRect(TRect{10, 10, 0, 0});
    for (std::int32_t y = 0; y < 12; ++y) {
        for (std::int32_t x = 0; x < 12; ++x) {
            const TRGBA expected = x < 9 && y < 9 ? TRGBA{255, 0, 0, 255} : TRGBA{};
            ASSERT_EQ(drawing.PixelAt(x, y), expected) << x << ", " << y;
        }
    }
}

TEST(CanvasShapes, FillRectOfThePlatformFillsAll) {
    TDrawing drawing(12, 12, pf24bit, /*anti_alias=*/true, /*use_library=*/false);
    drawing.zm_canvas->FillRect(TRect{0, 0, 10, 10});
    EXPECT_EQ(drawing.ColorAt(9, 9), kBluePixel);
    EXPECT_EQ(drawing.ColorAt(10, 9), 0U);
    EXPECT_EQ(drawing.ColorAt(9, 10), 0U);
}

TEST(CanvasShapes, RectangleHasAnOutlineOfOnePixel) {
    TDrawing drawing(12, 12);
    drawing.zm_canvas->Rectangle(2, 3, 9, 8);
    EXPECT_EQ(drawing.CoveredArea(), 7 * 5);
    for (std::int32_t y = 3; y < 8; ++y) {
        for (std::int32_t x = 2; x < 9; ++x) {
            const bool is_edge = x == 2 || x == 8 || y == 3 || y == 7;
            ASSERT_EQ(drawing.ColorAt(x, y), is_edge ? kRedPixel : kBluePixel) << x << ", " << y;
        }
    }
}

TEST(CanvasShapes, LinesRunThroughTheMiddlesOfPixels) {
    TDrawing drawing(20, 20);
    drawing.zm_canvas->MoveTo(2, 5);
    drawing.zm_canvas->LineTo(12, 5);
    EXPECT_EQ(drawing.ColorAt(7, 5), kRedPixel);
    EXPECT_EQ(drawing.PixelAt(7, 4), TRGBA{});
    EXPECT_EQ(drawing.PixelAt(7, 6), TRGBA{});
    EXPECT_EQ(drawing.zm_canvas->GetPenPos().x, 12);
    drawing.zm_canvas->GetPen().SetWidth(3);
    drawing.zm_canvas->DrawLine(15, 2, 15, 18);
    EXPECT_EQ(drawing.ColorAt(14, 10), kRedPixel);
    EXPECT_EQ(drawing.ColorAt(16, 10), kRedPixel);
    EXPECT_EQ(drawing.PixelAt(17, 10), TRGBA{});
}

TEST(CanvasShapes, AreasOfRoundShapes) {
    // The outline's middle lies half a pixel inside: with it the ellipse is 80 by 60 wide.
    TDrawing ellipse(100, 100);
    ellipse.zm_canvas->Ellipse(10, 20, 90, 80);
    const double whole = std::numbers::pi * 40 * 30;
    EXPECT_NEAR(ellipse.CoveredArea(), whole, whole / 100);

    // From the right counter-clockwise to the top: a quarter.
    TDrawing pie(100, 100);
    pie.zm_canvas->GetPen().SetStyle(psClear);
    pie.zm_canvas->Pie(10, 10, 91, 91, 91, 50, 50, 10);
    const bool is_smooth = test::ShapesHaveCoverage();
    EXPECT_NEAR(pie.CoveredArea(), std::numbers::pi * 40 * 40 / 4, is_smooth ? 15 : 45);
    EXPECT_NE(pie.PixelAt(70, 30).a, 0);
    EXPECT_EQ(pie.PixelAt(30, 30).a, 0);
    EXPECT_EQ(pie.PixelAt(70, 70).a, 0);

    TDrawing by_angle(100, 100);
    by_angle.zm_canvas->GetPen().SetStyle(psClear);
    by_angle.zm_canvas->Pie(10, 10, 91, 91, 0, 90);
    EXPECT_NE(by_angle.PixelAt(70, 70).a, 0);
    EXPECT_EQ(by_angle.PixelAt(70, 30).a, 0);

    TDrawing round(100, 100);
    round.zm_canvas->RoundRect(10, 10, 90, 90, 20, 20);
    // The corners of four quarters of a circle lack (4 - pi) r r in all.
    EXPECT_NEAR(round.CoveredArea(), 80 * 80 - (4 - std::numbers::pi) * 10.25 * 10.25,
                is_smooth ? 8 : 24);
    EXPECT_EQ(round.PixelAt(10, 10).a, 0);
}

TEST(CanvasShapes, ArcsAndCurvedLinesKeepTheirRadius) {
    if (!test::ShapesHaveCoverage()) {
        GTEST_SKIP() << "the length of a line of whole pixels is not its area";
    }
    TDrawing drawing(100, 100);
    drawing.zm_canvas->Arc(10, 10, 91, 91, 91, 50, 50, 10);
    EXPECT_NE(drawing.PixelAt(78, 22).a, 0);
    EXPECT_NEAR(drawing.CoveredArea(), std::numbers::pi * 40 / 2, 2);

    TDrawing curve(100, 100);
    curve.zm_canvas->DrawCurvedLine(80, 50, 50, 80, 50, 50);
    EXPECT_NEAR(curve.CoveredArea(), std::numbers::pi * 30 / 2, 2);
    EXPECT_NE(curve.PixelAt(71, 71).a, 0);
}

TEST(CanvasShapes, PolygonsAndLinesFollowTheirPoints) {
    TDrawing drawing(40, 40);
    drawing.zm_canvas->GetPen().SetStyle(psClear);
    drawing.zm_canvas->PolygonD({{4.4, 4.4}, {24.4, 3.6}, {4.0, 23.8}});
    EXPECT_NEAR(drawing.CoveredArea(), 200, 11);  // half of 20 by 20
    EXPECT_EQ(drawing.ColorAt(8, 8), kBluePixel);
    EXPECT_EQ(drawing.PixelAt(20, 20), TRGBA{});

    TDrawing lines(40, 40);
    lines.zm_canvas->DrawLinesPath({{2, 30.5}, {20, 30.5}, {30, 30.5}});
    if (test::ShapesHaveCoverage()) {
        EXPECT_NEAR(lines.PixelAt(10, 30).a, 128, 2);
        EXPECT_NEAR(lines.PixelAt(10, 31).a, 128, 2);
    }
    lines.zm_canvas->Polyline({{5, 2}, {15, 2}, {15, 12}});
    EXPECT_EQ(lines.ColorAt(10, 2), kRedPixel);
    EXPECT_EQ(lines.ColorAt(15, 8), kRedPixel);
}

TEST(CanvasPen, StylesAndTransparency) {
    TDrawing drawing(60, 20);
    TZmPen& pen = drawing.zm_canvas->GetPen();
    pen.SetWidth(2);
    pen.SetStyle(psDash);
    drawing.zm_canvas->DrawLine(0, 9.5, 60, 9.5);
    EXPECT_NE(drawing.PixelAt(3, 9).a, 0);  // 6 on, 2 off
    EXPECT_EQ(drawing.PixelAt(7, 9).a, 0);
    EXPECT_NE(drawing.PixelAt(10, 9).a, 0);
    EXPECT_EQ(drawing.canvas.Pen.Style, psDash);

    TDrawing clear(20, 20);
    clear.zm_canvas->GetPen().SetWidth(5);
    clear.zm_canvas->GetPen().SetStyle(psClear);
    clear.zm_canvas->DrawLine(0, 10, 20, 10);
    EXPECT_EQ(clear.CoveredArea(), 0);
    EXPECT_EQ(clear.zm_canvas->GetPen().GetWidth(), 5);

    TDrawing half(20, 20);
    half.zm_canvas->GetPen().SetTransparency(100);
    half.zm_canvas->DrawLine(0, 10, 20, 10);
    EXPECT_EQ(half.PixelAt(10, 10), (TRGBA{0, 0, 255, 100}));
    half.zm_canvas->DrawLine(0, 10, 20, 10);  // 100 + 100 - 100 * 100 / 255
    EXPECT_NEAR(half.PixelAt(10, 10).a, 161, 1);
    EXPECT_EQ(half.ColorAt(10, 10), kRedPixel);
}

TEST(CanvasPen, DefaultsAndTakeOver) {
    const TZmPen pen(nullptr);
    EXPECT_EQ(pen.GetColor(), 0xFFFFFF);
    EXPECT_EQ(pen.GetWidth(), 1);
    EXPECT_EQ(pen.GetStyle(), psSolid);
    EXPECT_EQ(pen.GetMode(), pmCopy);
    EXPECT_EQ(pen.GetTransparency(), 255);
    TPen platform_pen{0x123456, 7, psDot, pmXor};
    TZmPen taken(&platform_pen);
    EXPECT_EQ(taken.GetColor(), 0x123456);
    EXPECT_EQ(taken.GetWidth(), 7);
    EXPECT_EQ(taken.GetMode(), pmXor);
    EXPECT_EQ(ZmColorToARGB(-0x1000000 + 5, 51), 0x33FFFFFFU) << "the system's window is white";
    taken.SetTransparency(400);
    EXPECT_EQ(taken.GetTransparency(), 255);
    EXPECT_THROW(taken.SetWidth(std::numeric_limits<float>::quiet_NaN()), EZmException);
}

TEST(CanvasBrush, HatchesOnTilesOfEight) {
    const struct {
        TBrushStyle style;
        int lines;  // pixels of a tile that are line
    } kCases[] = {{bsHorizontal, 8}, {bsVertical, 8}, {bsCross, 15}};
    for (const auto& [style, expected] : kCases) {
        TDrawing drawing(17, 17);
        drawing.zm_canvas->GetBrush().SetBackColor(0x00FF00);
        drawing.zm_canvas->GetBrush().SetStyle(style);
        drawing.zm_canvas->FillRect(TRect{0, 0, 17, 17});
        int lines = 0;
        for (std::int32_t i = 0; i < 64; ++i) {
            lines += drawing.ColorAt(8 + i % 8, 8 + i / 8) == kBluePixel ? 1 : 0;
        }
        EXPECT_EQ(lines, expected) << static_cast<int>(style);
    }
    TDrawing vertical(17, 17);
    vertical.zm_canvas->GetBrush().SetStyle(bsVertical);
    vertical.zm_canvas->GradientFillRect(TRect{0, 0, 17, 17}, kRed, 0xFFFFFF, gpgNone);
    EXPECT_EQ(vertical.ColorAt(8, 4), kRedPixel) << "no gradient: the style counts";
    EXPECT_EQ(vertical.ColorAt(12, 4), 0xFFFFFFU);
    TDrawing clear(17, 17);
    clear.zm_canvas->GetBrush().SetStyle(bsClear);
    clear.zm_canvas->FillRect(TRect{0, 0, 17, 17});
    EXPECT_EQ(clear.CoveredArea(), 0);
}

TEST(CanvasBrush, GradientPoints) {
    const struct {
        TZmGDIPlusGradient direction;
        float x1, y1, x2, y2;
    } kCases[] = {
        {gpgHorizontal, 0, 0, 11, 0}, {gpgVertical, 0, 0, 0, 7},    {gpgHorzCenter, 0, 0, 5, 0},
        {gpgVertCenter, 0, 0, 0, 3},  {gpgDiagonal, 0, 0, 11, 7},   {gpgDiagonal2, 11, 0, 0, 7},
        {gpgDiagCenter, 0, 0, 5, 3},  {gpgDiagCenter2, 0, 3, 5, 0}, {gpgNone, 0, 0, 0, 0}};
    TZmBrush brush(nullptr);
    for (const auto& [direction, x1, y1, x2, y2] : kCases) {
        brush.SetGradient(direction, 11, 7);
        EXPECT_EQ(brush.GetGradPoint1().x, x1) << direction;
        EXPECT_EQ(brush.GetGradPoint1().y, y1) << direction;
        EXPECT_EQ(brush.GetGradPoint2().x, x2) << direction;
        EXPECT_EQ(brush.GetGradPoint2().y, y2) << direction;
    }
}

TEST(CanvasBrush, GradientFillsStartAtTheirRectangle) {
    TDrawing drawing(121, 12);
    drawing.zm_canvas->GradientFillRect(TRect{10, 0, 111, 12}, 0, 0xFFFFFF, gpgHorizontal);
    EXPECT_NEAR(drawing.PixelAt(10, 5).g, 0, 4);
    EXPECT_NEAR(drawing.PixelAt(60, 5).g, 127, 4);
    EXPECT_NEAR(drawing.PixelAt(109, 5).g, 250, 4);
    EXPECT_EQ(drawing.PixelAt(9, 5).a, 0);
    // The middle is the far end, from which it goes back.
    drawing.zm_canvas->GradientFillRect(TRect{10, 0, 111, 12}, 0, 0xFFFFFF, gpgHorzCenter);
    EXPECT_NEAR(drawing.PixelAt(60, 5).g, 255, 6);
    EXPECT_NEAR(drawing.PixelAt(85, 5).g, 127, 6);
    drawing.zm_canvas->FillRect(TRect{0, 0, 5, 5});
    EXPECT_EQ(drawing.ColorAt(2, 2), kBluePixel) << "the brush is as it was";
}

TEST(CanvasTransform, StepsActBeforeThoseAlreadyThere) {
    TDrawing drawing(40, 40);
    drawing.zm_canvas->Translate(20, 10);
    drawing.zm_canvas->Rotate(90);  // right becomes down
    drawing.zm_canvas->FillRect(TRect{0, 0, 11, 5});
    EXPECT_EQ(drawing.CoveredArea(), 40);
    EXPECT_EQ(drawing.ColorAt(16, 10), kBluePixel);
    EXPECT_EQ(drawing.ColorAt(19, 19), kBluePixel);
    EXPECT_EQ(drawing.PixelAt(20, 10).a, 0);
    drawing.zm_canvas->ResetTransform();
    drawing.zm_canvas->Scale(2, 3);
    drawing.zm_canvas->FillRect(TRect{0, 0, 3, 2});
    EXPECT_EQ(drawing.ColorAt(3, 2), kBluePixel);
    EXPECT_EQ(drawing.PixelAt(4, 2).a, 0);
    EXPECT_EQ(drawing.PixelAt(3, 3).a, 0);
    drawing.zm_canvas->DrawLine(0, 10, 20, 10);  // pens keep their width
    EXPECT_EQ(drawing.ColorAt(5, 30), kRedPixel);
    EXPECT_EQ(drawing.PixelAt(5, 29).a, 0);
    EXPECT_EQ(drawing.PixelAt(5, 31).a, 0);
}

TEST(CanvasTransform, OnlyTheTranslationReachesThePlatform) {
    TDrawing drawing(20, 20, pf24bit, /*anti_alias=*/true, /*use_library=*/false);
    drawing.zm_canvas->Translate(5, 6);
    drawing.zm_canvas->Rotate(90);
    drawing.zm_canvas->ResetTransform();
    drawing.zm_canvas->FillRect(TRect{0, 0, 2, 2});
    EXPECT_EQ(drawing.ColorAt(5, 6), kBluePixel);
    EXPECT_EQ(drawing.ColorAt(6, 7), kBluePixel);
    EXPECT_EQ(drawing.ColorAt(0, 0), 0U);
}

TEST(CanvasModes, RefusedOrdinalsAndHardEdges) {
    TDrawing drawing(40, 40);
    EXPECT_EQ(drawing.zm_canvas->GetSmoothingMode(), zmsmAntialias);
    EXPECT_EQ(drawing.zm_canvas->GetTextRendering(), zmtrTextRenderingHintAntiAlias);
    drawing.zm_canvas->SetSmoothingMode(zmsmInvalid);
    EXPECT_EQ(drawing.zm_canvas->GetSmoothingMode(), zmsmAntialias);

    TDrawing hard(40, 40, pf32bit, /*anti_alias=*/false);
    EXPECT_EQ(hard.zm_canvas->GetSmoothingMode(), zmsmBestPerformance);
    EXPECT_EQ(hard.zm_canvas->GetTextRendering(), zmtrTextRenderingHintSystemDefault);
    hard.zm_canvas->Ellipse(5, 5, 35, 35);
    EXPECT_TRUE(hard.IsAllOrNothing());
}

TEST(CanvasModes, CopyReplacesColourAndAlpha) {
    TDrawing drawing(12, 12);
    drawing.zm_canvas->FillRect(TRect{0, 0, 12, 12});
    drawing.zm_canvas->SetCompositingMode(zmCompositingModeSourceCopy, zmCompositingQualityDefault);
    drawing.zm_canvas->GetBrush().SetTransparency(40);
    drawing.zm_canvas->GetBrush().SetColor(kRed);
    drawing.zm_canvas->FillRect(TRect{0, 0, 6, 6});
    EXPECT_EQ(drawing.PixelAt(2, 2), (TRGBA{0, 0, 255, 40}));
    EXPECT_EQ(drawing.PixelAt(8, 8), (TRGBA{255, 0, 0, 255}));
}

TEST(CanvasBadInput, ExtremeCoordinatesDrawWhatIsVisible) {
    constexpr std::int32_t kLow = std::numeric_limits<std::int32_t>::min();
    constexpr std::int32_t kHigh = std::numeric_limits<std::int32_t>::max();
    TDrawing drawing(30, 30);
    drawing.zm_canvas->FillRect(TRect{kLow, kLow, kHigh, kHigh});
    EXPECT_EQ(drawing.CoveredArea(), 900);
    TDrawing others(30, 30);
    others.zm_canvas->Rectangle(kHigh - 1, kHigh - 1, kHigh, kHigh);
    others.zm_canvas->Ellipse(kHigh, 0, kLow, 1);
    others.zm_canvas->RoundRect(kLow, kLow, kHigh, kHigh, kHigh, kLow);
    others.zm_canvas->Polygon({{kLow, kLow}, {kHigh, kLow}, {0, kHigh}});
    others.zm_canvas->Pie(kLow, kLow, kHigh, kHigh, kLow, 0, 0, kHigh);
    others.zm_canvas->Arc(0, 0, 0, 0, kLow, 0, 0, kHigh);
    others.zm_canvas->DrawLine(std::nan(""), 0, 1e300, -1e300);
    others.zm_canvas->DrawLinesPath({});
    others.zm_canvas->Polygon({});
    others.zm_canvas->GetPen().SetWidth(1e30F);
    others.zm_canvas->MoveTo(kLow, 15);
    others.zm_canvas->LineTo(kHigh, 15);
    EXPECT_EQ(others.ColorAt(15, 15), kRedPixel);
}

TEST(CanvasMaking, WithoutTheLibraryByChoiceOrSetting) {
    TBitmap bitmap;
    TCanvas canvas(bitmap);
    EXPECT_THROW(TZmCanvas(canvas, true, true), EZmException) << "a bitmap of no size";
    ASSERT_TRUE(bitmap.SetSize(8, 8, pf24bit));
    ZmGlobalSettings().fUseGDIPlus = false;
    {
        TZmCanvas plain(canvas, true, true);
        EXPECT_FALSE(plain.GetUseGDIPlus());
        EXPECT_EQ(plain.MeasureText(u"text").x, 0);
        plain.Rectangle(0, 0, 8, 8);
    }
    ZmGlobalSettings().fUseGDIPlus = true;
    TZmCanvas with_library(canvas, true, true);
    EXPECT_TRUE(with_library.GetUseGDIPlus());
}

TEST(CanvasTargets, OtherDepths) {
    TDrawing rgb(12, 12, pf24bit);
    rgb.zm_canvas->GetBrush().SetTransparency(51);  // a fifth of 255
    rgb.zm_canvas->FillRect(TRect{0, 0, 12, 12});
    EXPECT_EQ(rgb.ColorAt(3, 3), 51U);

    TBitmap palette;
    ASSERT_TRUE(palette.SetSize(12, 12, pf8bit));
    palette.ColorTable()[7] = TRGB{250, 3, 3};
    TCanvas palette_canvas(palette);
    TZmCanvas on_palette(palette_canvas, true, true);
    on_palette.GetBrush().SetColor(kBlue);
    on_palette.FillRect(TRect{2, 0, 12, 12});
    on_palette.Flush();
    EXPECT_EQ(palette.GetScanLine(5)[1], 0);
    EXPECT_EQ(palette.GetScanLine(5)[5], 7);

    TBitmap bits;
    ASSERT_TRUE(bits.SetSize(16, 4, pf1bit));
    TCanvas bits_canvas(bits);
    TZmCanvas on_bits(bits_canvas, false, true);
    on_bits.GetBrush().SetColor(0xFFFFFF);
    on_bits.FillRect(TRect{3, 0, 13, 5});
    on_bits.Flush();
    EXPECT_EQ(bits.GetScanLine(1)[0], 0x1F);
    EXPECT_EQ(bits.GetScanLine(1)[1], 0xF0);
}

TEST(PlainCanvas, ShapesInWholePixels) {
    TDrawing drawing(40, 40, pf32bit, /*anti_alias=*/true, /*use_library=*/false);
    TCanvas& canvas = drawing.canvas;
    canvas.Pen = TPen{kRed, 1, psSolid, pmCopy};
    canvas.Brush = TBrush{kBlue, bsSolid};
    canvas.Rectangle(TRect{2, 3, 9, 8});
    EXPECT_EQ(drawing.ColorAt(2, 3), kRedPixel);
    EXPECT_EQ(drawing.ColorAt(8, 7), kRedPixel);
    EXPECT_EQ(drawing.ColorAt(5, 5), kBluePixel);
    EXPECT_EQ(drawing.ColorAt(9, 5), 0U);
    EXPECT_EQ(drawing.PixelAt(5, 5).a, 0);
    canvas.MoveTo(0, 20);
    canvas.LineTo(10, 20);
    EXPECT_EQ(drawing.ColorAt(9, 20), kRedPixel);
    EXPECT_EQ(drawing.ColorAt(10, 20), 0U) << "the end is left out";
    canvas.Pen.Mode = pmXor;
    canvas.MoveTo(0, 20);
    canvas.LineTo(10, 20);
    EXPECT_EQ(drawing.ColorAt(5, 20), 0U);
    canvas.Pen.Mode = pmCopy;
    canvas.Rectangle(TRect{std::numeric_limits<std::int32_t>::min(), 12, 33, 18});
    EXPECT_EQ(drawing.ColorAt(32, 15), kRedPixel) << "far shapes are not rounded";
    EXPECT_EQ(drawing.ColorAt(33, 15), 0U);
    canvas.Ellipse(TRect{20, 20, 40, 40});
    EXPECT_EQ(drawing.ColorAt(20, 30), kRedPixel);
    EXPECT_EQ(drawing.ColorAt(30, 30), kBluePixel);
    EXPECT_EQ(drawing.ColorAt(20, 20), 0U);
}

}  // namespace
}  // namespace zm
