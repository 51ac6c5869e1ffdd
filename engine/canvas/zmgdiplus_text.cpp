/// Text of the antialiasing canvas.

#include <algorithm>
#include <cmath>
#include <numbers>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/canvas/zmgdiplus.h"
#include "engine/canvas/zmgdiplus_p.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kHalfTurn = 180;

std::int32_t CeilToInt(double value) {
    return TruncToInt(std::ceil(value));
}

/// Position and size of a rectangle, right and bottom exclusive.
platform::TDrawRect DrawRectOf(const TRect& rect) {
    return {static_cast<float>(rect.left), static_cast<float>(rect.top),
            static_cast<float>(std::int64_t{rect.right} - rect.left),
            static_cast<float>(std::int64_t{rect.bottom} - rect.top)};
}

TPoint Rounded(const platform::TDrawSize& size) {
    return {RoundHalfEven(size.width), RoundHalfEven(size.height)};
}

}  // namespace

platform::TDrawSize TurnedSize(double width, double height, std::int32_t angle) {
    const double radians = angle * std::numbers::pi / kHalfTurn;
    const double cosine = std::abs(std::cos(radians));
    const double sine = std::abs(std::sin(radians));
    return {static_cast<float>(cosine * width + sine * height),
            static_cast<float>(sine * width + cosine * height)};
}

/// Measures or draws a text in a layout rectangle, in the platform canvas's font and its colour,
/// with the brush's alpha. The size is that of the measured text, 0 when drawn.
TPoint TZmCanvas::TextCore(const std::u16string& text, const platform::TDrawRect& layout,
                           TTextPass pass) {
    if (text.empty() || fGraphics == nullptr) {
        return {};
    }
    const platform::TDrawFont font = DrawFontOf(fCanvas.Font);
    const platform::TTextFormat format{fTypographicDrawText};
    if (pass == TTextPass::kDraw) {
        const auto color = ZmColorToARGB(fCanvas.Font.Color, fBrush->GetTransparency());
        fGraphics->DrawString(text, font, format, layout, color);
        return {};
    }
    const auto size = fGraphics->MeasureString(text, font, format, layout);
    return size ? TPoint{CeilToInt(size->width), CeilToInt(size->height)} : TPoint{};
}

TPoint TZmCanvas::MeasureText(const std::u16string& Text, std::int32_t Angle) {
    const TPoint size = TextCore(Text, {}, TTextPass::kMeasure);
    return Angle % kHalfTurn == 0 ? size : Rounded(TurnedSize(size.x, size.y, Angle));
}

TPoint TZmCanvas::MeasureText(const std::u16string& Text, const TRect& BoundingRect,
                              std::int32_t Angle) {
    platform::TDrawRect layout = DrawRectOf(BoundingRect);
    layout.width += 1;
    layout.height += 1;
    if (Angle % kHalfTurn != 0) {
        const TPoint turned = Rounded(TurnedSize(layout.width, layout.height, Angle));
        layout.width = static_cast<float>(turned.x);
        layout.height = static_cast<float>(turned.y);
    }
    return TextCore(Text, layout, TTextPass::kMeasure);
}

void TZmCanvas::DrawText(const std::u16string& Text, const TRect& BoundingRect) {
    DrawText(Text, BoundingRect, /*Angle=*/0);
}

void TZmCanvas::DrawText(const std::u16string& Text, const TRect& BoundingRect,
                         std::int32_t Angle) {
    if (fGraphics == nullptr) {
        return;
    }
    const platform::TDrawRect box = DrawRectOf(BoundingRect);
    if (Angle == 0) {
        TextCore(Text, box, TTextPass::kDraw);
        return;
    }
    fGraphics->SetClipRect(box);
    DrawTurnedText(Text, box, Angle);
    ResetTransform();
    fGraphics->ResetClip();
}

/// Required: the text begins at the middle of the box's turned size and runs on from there, half
/// of its height to either side; it is not centred along its line.
void TZmCanvas::DrawTurnedText(const std::u16string& text, const platform::TDrawRect& box,
                               std::int32_t angle) {
    const TPoint turned = Rounded(TurnedSize(box.width, box.height, angle));
    Translate(TruncToInt(double{box.x} + turned.x / 2), TruncToInt(double{box.y} + turned.y / 2));
    Rotate(angle);
    platform::TDrawRect layout{0, 0, static_cast<float>(turned.x), static_cast<float>(turned.y)};
    const TPoint size = TextCore(text, layout, TTextPass::kMeasure);
    if (box.width <= 0 || box.height <= 0) {
        layout = {};
    } else {
        layout.y = static_cast<float>(-size.y / 2);
    }
    TextCore(text, layout, TTextPass::kDraw);
}

void TZmCanvas::DrawText(const std::u16string& Text, std::int32_t X, std::int32_t Y,
                         std::int32_t Angle) {
    if (Angle == 0) {
        TextCore(Text, {static_cast<float>(X), static_cast<float>(Y), 0, 0}, TTextPass::kDraw);
        return;
    }
    if (fGraphics != nullptr) {
        Translate(X, Y);
        Rotate(Angle);
        TextCore(Text, {}, TTextPass::kDraw);
        ResetTransform();
    }
}

// The names of the platform's canvas.

TPoint TZmCanvas::TextExtent(const std::u16string& Text) {
    return fUseGDIPlus ? TextCore(Text, {}, TTextPass::kMeasure) : GDITextExtent(Text);
}

void TZmCanvas::TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text) {
    if (fUseGDIPlus) {
        DrawText(Text, X, Y, /*Angle=*/0);
    } else {
        GDITextOut(X, Y, Text);
    }
}

void TZmCanvas::TextRect(const TRect& Rect, std::int32_t X, std::int32_t Y,
                         const std::u16string& Text) {
    if (!fUseGDIPlus) {
        GDITextRect(Rect, X, Y, Text);
        return;
    }
    fGraphics->SetClipRect(DrawRectOf(Rect));
    DrawText(Text, X, Y, /*Angle=*/0);
    fGraphics->ResetClip();
}

void TZmCanvas::GDITextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text) {
    fCanvas.TextOut(X, Y, Text);
}

void TZmCanvas::GDITextOut2(std::int32_t X, std::int32_t Y, const std::u16string& Text) {
    const TBrush brush = fCanvas.Brush;
    fCanvas.Brush.Style = bsClear;
    fCanvas.TextOut(X, Y, Text);
    fCanvas.Brush = brush;
}

void TZmCanvas::GDITextRect(const TRect& Rect, std::int32_t X, std::int32_t Y,
                            const std::u16string& Text) {
    fCanvas.TextRect(Rect, X, Y, Text);
}

void TZmCanvas::GDITextRectEx(const TRect& Rect, const std::u16string& Text,
                              const platform::TPlainTextLayout& Layout) {
    fCanvas.TextInRect(Rect, Text, Layout);
}

}  // namespace zm
