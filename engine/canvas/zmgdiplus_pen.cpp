/// Pen and brush.

#include "engine/canvas/zmgdiplus.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

std::int32_t LimitAlpha(std::int32_t alpha) {
    return Clamp8(alpha);
}

}  // namespace

// Pen.

TZmPen::TZmPen(TPen* Pen, bool UseGDIPlus) : hold_(UseGDIPlus), fPen(Pen) {
    if (Pen != nullptr) {
        fColor = Pen->Color;
        fWidth = static_cast<float>(Pen->Width);
        fStyle = Pen->Style;
        fMode = Pen->Mode;
    }
    Rebuild();
}

void TZmPen::SetColor(TColor Color) {
    fColor = Color;
    Rebuild();
}

void TZmPen::SetTransparency(std::int32_t Transparency) {
    fTransparency = LimitAlpha(Transparency);
    Rebuild();
}

void TZmPen::SetWidth(float Width) {
    fWidth = Width;
    Rebuild();
}

void TZmPen::SetStyle(TPenStyle Style) {
    fStyle = Style;
    Rebuild();
}

void TZmPen::SetMode(TPenMode Mode) {
    fMode = Mode;
    Rebuild();
}

void TZmPen::SetLineJoin(TZmCanvasPenLineJoin LineJoin) {
    fLineJoin = LineJoin;
    Rebuild();
}

/// Brings the platform's pen and the library's in line with the fields. The styles' ordinals are
/// the library's dashes; a pen without a line is a solid one that cannot be seen.
void TZmPen::Rebuild() {
    if (fPen != nullptr) {
        *fPen = TPen{fColor, RoundHalfEven(fWidth), fStyle, fMode};
    }
    if (!hold_.IsBound()) {
        return;
    }
    const bool has_line = fStyle != psClear;
    platform::TVectorPenRecord record;
    record.color = ZmColorToARGB(fColor, has_line ? fTransparency : 0);
    record.width = fWidth;
    record.dash = static_cast<std::uint8_t>(has_line ? fStyle : psSolid);
    record.join = fLineJoin;
    fGHandle = platform::CreateVectorPen(record);
    if (fGHandle == nullptr) {
        throw EZmException("Cannot create TZmPen.");
    }
}

// Brush.

TZmBrush::TZmBrush(TBrush* Brush, bool UseGDIPlus) : hold_(UseGDIPlus), fBrush(Brush) {
    if (Brush != nullptr) {
        fColor = Brush->Color;
        fStyle = Brush->Style;
    }
    Rebuild();
}

void TZmBrush::SetColor(TColor Color) {
    fColor = Color;
    Rebuild();
}

void TZmBrush::SetTransparency(std::int32_t Transparency) {
    fTransparency = LimitAlpha(Transparency);
    Rebuild();
}

void TZmBrush::SetBackColor(TColor BackColor) {
    fBackColor = BackColor;
    Rebuild();
}

void TZmBrush::SetBackTransparency(std::int32_t BackTransparency) {
    fBackTransparency = LimitAlpha(BackTransparency);
    Rebuild();
}

void TZmBrush::SetStyle(TBrushStyle Style) {
    fStyle = Style;
    Rebuild();
}

void TZmBrush::SetGradPoints(TZmGPPointF Point1, TZmGPPointF Point2) {
    fGradPoint1 = Point1;
    fGradPoint2 = Point2;
    Rebuild();
}

void TZmBrush::SetGradient(TZmGDIPlusGradient Dir, std::int32_t Width, std::int32_t Height) {
    const auto width = static_cast<float>(Width);
    const auto height = static_cast<float>(Height);
    const auto half_width = static_cast<float>(Width / 2);
    const auto half_height = static_cast<float>(Height / 2);
    switch (Dir) {
        case gpgHorizontal: return SetGradPoints({0, 0}, {width, 0});
        case gpgVertical: return SetGradPoints({0, 0}, {0, height});
        case gpgHorzCenter: return SetGradPoints({0, 0}, {half_width, 0});
        case gpgVertCenter: return SetGradPoints({0, 0}, {0, half_height});
        case gpgDiagonal: return SetGradPoints({0, 0}, {width, height});
        case gpgDiagonal2: return SetGradPoints({width, 0}, {0, height});
        case gpgDiagCenter: return SetGradPoints({0, 0}, {half_width, half_height});
        case gpgDiagCenter2: return SetGradPoints({0, half_height}, {half_width, 0});
        case gpgNone: return SetGradPoints({0, 0}, {0, 0});
    }
}

void TZmBrush::Rebuild() {
    RebuildAt(0, 0);
}

/// Brings the platform's brush and the library's in line with the fields, a gradient counting its
/// points from a place.
void TZmBrush::RebuildAt(float origin_x, float origin_y) {
    if (fBrush != nullptr) {
        *fBrush = TBrush{fColor, fStyle};
    }
    if (!hold_.IsBound()) {
        return;
    }
    platform::TVectorBrushRecord record;
    record.color = ZmColorToARGB(fColor, fTransparency);
    record.back_color = ZmColorToARGB(fBackColor, fBackTransparency);
    if (fGradPoint2.x != 0 || fGradPoint2.y != 0) {
        record.kind = platform::vbLinear;
        record.point1 = {origin_x + fGradPoint1.x, origin_y + fGradPoint1.y};
        record.point2 = {origin_x + fGradPoint2.x, origin_y + fGradPoint2.y};
    } else if (fStyle >= bsHorizontal) {
        record.kind = platform::vbHatch;
        record.hatch = static_cast<std::uint8_t>(fStyle - bsHorizontal);
    } else if (fStyle == bsClear) {
        record.color = ZmColorToARGB(fColor, 0);
    }
    fGHandle = platform::CreateVectorBrush(record);
    if (fGHandle == nullptr) {
        throw EZmException("Cannot create TZmBrush.");
    }
}

}  // namespace zm
