#include "engine/canvas/zmplatformcanvas.h"

#include "engine/platform/screen.h"

namespace zm {

TColor ColorToRGB(TColor Color) {
    const auto number = static_cast<std::uint8_t>(Color & 0xFF);
    return Color < 0 ? static_cast<TColor>(platform::SystemColor(number)) : Color;
}

platform::TDrawFont DrawFontOf(const TFont& font) {
    platform::TDrawFont result;
    result.family = font.Name;
    result.height = font.Height;
    result.bold = (font.Style & fsBold) != 0;
    result.italic = (font.Style & fsItalic) != 0;
    result.underline = (font.Style & fsUnderline) != 0;
    result.strike_out = (font.Style & fsStrikeOut) != 0;
    return result;
}

TCanvas::TCanvas(TBitmap& bitmap) : Font(own_font_), bitmap_(bitmap) {}

TCanvas::TCanvas(TBitmap& bitmap, TFont& font) : Font(font), bitmap_(bitmap) {}

TCanvas::~TCanvas() = default;

/// The platform's side, made anew when the bitmap has other pixels than at the last drawing.
platform::TPlatformCanvas* TCanvas::Device() {
    const platform::TDrawTarget target = bitmap_.GetDrawTarget();
    if (target.section == nullptr) {
        device_.reset();
    } else if (device_ == nullptr || bitmap_.GetGeneration() != generation_) {
        device_.reset();
        device_ = platform::CreatePlatformCanvas(target);
        generation_ = bitmap_.GetGeneration();
    }
    return device_.get();
}

platform::TPlainPen TCanvas::PlainPen() const {
    return {ColorToRGB(Pen.Color), Pen.Width, Pen.Style, Pen.Mode};
}

platform::TPlainBrush TCanvas::PlainBrush() const {
    return {ColorToRGB(Brush.Color), Brush.Style};
}

void* TCanvas::GetHandle() {
    platform::TPlatformCanvas* const device = Device();
    return device != nullptr ? device->DeviceContext() : nullptr;
}

// Lines.

void TCanvas::MoveTo(std::int32_t X, std::int32_t Y) {
    if (auto* const device = Device()) {
        device->MoveTo(X, Y);
    }
}

void TCanvas::LineTo(std::int32_t X, std::int32_t Y) {
    if (auto* const device = Device()) {
        device->LineTo(PlainPen(), X, Y);
    }
}

void TCanvas::Polyline(const std::vector<TPoint>& Points) {
    if (auto* const device = Device()) {
        device->Polyline(PlainPen(), Points);
    }
}

void TCanvas::Arc(const TRect& Rect, TPoint Start, TPoint End) {
    if (auto* const device = Device()) {
        device->Arc(PlainPen(), Rect, Start, End);
    }
}

// Shapes.

void TCanvas::Polygon(const std::vector<TPoint>& Points) {
    if (auto* const device = Device()) {
        device->Polygon(PlainPen(), PlainBrush(), Points);
    }
}

void TCanvas::FillRect(const TRect& Rect) {
    if (auto* const device = Device()) {
        device->FillRect(PlainBrush(), Rect);
    }
}

void TCanvas::Rectangle(const TRect& Rect) {
    if (auto* const device = Device()) {
        device->Rectangle(PlainPen(), PlainBrush(), Rect);
    }
}

void TCanvas::Ellipse(const TRect& Rect) {
    if (auto* const device = Device()) {
        device->Ellipse(PlainPen(), PlainBrush(), Rect);
    }
}

void TCanvas::RoundRect(const TRect& Rect, std::int32_t CornerWidth, std::int32_t CornerHeight) {
    if (auto* const device = Device()) {
        device->RoundRect(PlainPen(), PlainBrush(), Rect, CornerWidth, CornerHeight);
    }
}

void TCanvas::Pie(const TRect& Rect, TPoint Start, TPoint End) {
    if (auto* const device = Device()) {
        device->Pie(PlainPen(), PlainBrush(), Rect, Start, End);
    }
}

// The device's state.

void TCanvas::OffsetViewportOrg(std::int32_t DX, std::int32_t DY) {
    if (auto* const device = Device()) {
        device->OffsetViewportOrg(DX, DY);
    }
}

void TCanvas::SaveState() {
    if (auto* const device = Device()) {
        device->SaveState();
    }
}

void TCanvas::RestoreState() {
    if (auto* const device = Device()) {
        device->RestoreState();
    }
}

// Text.

TPoint TCanvas::TextExtent(const std::u16string& Text) {
    auto* const device = Device();
    return device != nullptr ? device->TextExtent(Text, DrawFontOf(Font)) : TPoint{};
}

void TCanvas::TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text) {
    DrawText(X, Y, Text, /*clip=*/nullptr);
}

void TCanvas::TextRect(const TRect& Rect, std::int32_t X, std::int32_t Y,
                       const std::u16string& Text) {
    DrawText(X, Y, Text, &Rect);
}

void TCanvas::DrawText(std::int32_t x, std::int32_t y, const std::u16string& text,
                       const TRect* clip) {
    if (auto* const device = Device()) {
        const TColor background = ColorToRGB(Brush.Color);
        device->TextOut(x, y, text, DrawFontOf(Font), ColorToRGB(Font.Color),
                        Brush.Style == bsClear ? nullptr : &background, clip);
    }
}

void TCanvas::TextInRect(const TRect& Rect, const std::u16string& Text,
                         const platform::TPlainTextLayout& Layout) {
    if (auto* const device = Device()) {
        device->TextInRect(Rect, Text, DrawFontOf(Font), ColorToRGB(Font.Color), Layout);
    }
}

}  // namespace zm
