#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "engine/bitmap/zmfont.h"
#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/foundation/zmdefs.h"
#include "engine/platform/drawing.h"

namespace zm {

/// Line styles of a platform pen; the ordinals go to the platform.
enum TPenStyle : std::uint8_t {
    psSolid,
    psDash,
    psDot,
    psDashDot,
    psDashDotDot,
    psClear,
    psInsideFrame,
    psUserStyle,
    psAlternate,
};

/// How a platform pen combines with the pixel below; the ordinals go to the platform.
enum TPenMode : std::uint8_t {
    pmBlack,
    pmWhite,
    pmNop,
    pmNot,
    pmCopy,
    pmNotCopy,
    pmMergePenNot,
    pmMaskPenNot,
    pmMergeNotPen,
    pmMaskNotPen,
    pmMerge,
    pmNotMerge,
    pmMask,
    pmNotMask,
    pmXor,
    pmNotXor,
};

/// Fillings of a platform brush; the ordinals go to the platform.
enum TBrushStyle : std::uint8_t {
    bsSolid,
    bsClear,
    bsHorizontal,
    bsVertical,
    bsFDiagonal,
    bsBDiagonal,
    bsCross,
    bsDiagCross,
};

/// Pen of a platform canvas, as a new one stands: black, one pixel, solid.
struct TPen {
    TColor Color = 0;
    std::int32_t Width = 1;
    TPenStyle Style = psSolid;
    TPenMode Mode = pmCopy;
};

/// Brush of a platform canvas, as a new one stands: white, solid.
struct TBrush {
    TColor Color = 0xFFFFFF;
    TBrushStyle Style = bsSolid;
};

/// The plain drawing surface of a platform bitmap, with the pen, brush and font that are selected
/// in it. The bitmap outlives it; when its size or layout changes, drawing goes on with the new
/// pixels, from the origin. Where the platform cannot draw, nothing happens and texts measure 0.
///
/// Coordinates are pixels of the bitmap, moved by the viewport's origin; rectangles are right and
/// bottom exclusive. Belongs to one thread at a time.
class TCanvas {
public:
    explicit TCanvas(TBitmap& bitmap);
    /// With a font that is kept elsewhere and outlives the canvas.
    TCanvas(TBitmap& bitmap, TFont& font);
    ~TCanvas();
    TCanvas(const TCanvas&) = delete;
    TCanvas& operator=(const TCanvas&) = delete;

    TFont& Font;
    TPen Pen;
    TBrush Brush;

    TBitmap& GetBitmap() { return bitmap_; }
    /// The device context, nil where the platform has none.
    void* GetHandle();

    void MoveTo(std::int32_t X, std::int32_t Y);
    /// From the current position to a point, without it.
    void LineTo(std::int32_t X, std::int32_t Y);
    void Polyline(const std::vector<TPoint>& Points);
    void Polygon(const std::vector<TPoint>& Points);
    /// With the brush alone / with the outline of the pen too.
    void FillRect(const TRect& Rect);
    void Rectangle(const TRect& Rect);
    void Ellipse(const TRect& Rect);
    void RoundRect(const TRect& Rect, std::int32_t CornerWidth, std::int32_t CornerHeight);
    /// Counter-clockwise from the ray through the first point to that through the second.
    void Pie(const TRect& Rect, TPoint Start, TPoint End);
    void Arc(const TRect& Rect, TPoint Start, TPoint End);
    void OffsetViewportOrg(std::int32_t DX, std::int32_t DY);
    void SaveState();
    void RestoreState();

    TPoint TextExtent(const std::u16string& Text);
    /// The box behind the text is filled unless the brush is of the style that fills nothing.
    void TextOut(std::int32_t X, std::int32_t Y, const std::u16string& Text);
    void TextRect(const TRect& Rect, std::int32_t X, std::int32_t Y, const std::u16string& Text);
    /// Placed within a rectangle, no box behind it.
    void TextInRect(const TRect& Rect, const std::u16string& Text,
                    const platform::TPlainTextLayout& Layout);

private:
    platform::TPlatformCanvas* Device();
    void DrawText(std::int32_t x, std::int32_t y, const std::u16string& text, const TRect* clip);
    platform::TPlainPen PlainPen() const;
    platform::TPlainBrush PlainBrush() const;

    TBitmap& bitmap_;
    TFont own_font_;  // unused with a font from elsewhere
    std::unique_ptr<platform::TPlatformCanvas> device_;
    std::uint32_t generation_ = 0;  // of the pixels that device_ draws on
};

/// The colour that a value stands for: negative values number the system's colours (low byte).
TColor ColorToRGB(TColor Color);

/// What the drawing calls take of a font.
platform::TDrawFont DrawFontOf(const TFont& font);

}  // namespace zm
