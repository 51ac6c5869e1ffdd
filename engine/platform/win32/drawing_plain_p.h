#pragma once

#include "engine/platform/drawing.h"
#include "engine/platform/drawing_path_p.h"
#include "engine/platform/win32/drawing_fonts_p.h"

namespace zm::platform {

/// Hands the target's colours to its section, which may be older than they are.
void ShowColors(const TDrawTarget& target);

/// TPlatformCanvas over the device context of the section. Each call selects its own objects and
/// leaves the context as it was, but for origin and current position, which the context keeps.
class TGdiCanvas final : public TPlatformCanvas {
public:
    explicit TGdiCanvas(const TDrawTarget& target);

    void MoveTo(std::int32_t x, std::int32_t y) override;
    void LineTo(const TPlainPen& pen, std::int32_t x, std::int32_t y) override;
    void Polyline(const TPlainPen& pen, std::span<const TPoint> points) override;
    void Polygon(const TPlainPen& pen, const TPlainBrush& brush,
                 std::span<const TPoint> points) override;
    void FillRect(const TPlainBrush& brush, const TRect& rect) override;
    void Rectangle(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect) override;
    void Ellipse(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect) override;
    void RoundRect(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect,
                   std::int32_t corner_width, std::int32_t corner_height) override;
    void Pie(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect, TPoint start,
             TPoint end) override;
    void Arc(const TPlainPen& pen, const TRect& rect, TPoint start, TPoint end) override;

    void OffsetViewportOrg(std::int32_t dx, std::int32_t dy) override;
    void SaveState() override { ::SaveDC(context_); }
    void RestoreState() override { ::RestoreDC(context_, -1); }

    TPoint TextExtent(std::u16string_view text, const TDrawFont& font) override;
    void TextOut(std::int32_t x, std::int32_t y, std::u16string_view text, const TDrawFont& font,
                 TColor color, const TColor* background, const TRect* clip) override;
    void TextInRect(const TRect& rect, std::u16string_view text, const TDrawFont& font,
                    TColor color, const TPlainTextLayout& layout) override;

    void* DeviceContext() const override { return context_; }

private:
    /// What is seen of the target with a margin, in the coordinates of the calls.
    TDeviceBox Neighbourhood(double margin) const;
    bool IsNear(const TRect& rect) const;
    bool AreNear(std::span<const TPoint> points) const;
    /// The rectangle as far as it may be seen.
    RECT SeenPart(const TRect& rect) const;
    void StrokeFar(const TPlainPen& pen, const TOutline& outline);
    void DrawFar(const TPlainPen& pen, const TPlainBrush& brush, const TOutline& outline);

    TDrawTarget target_;
    HDC context_;
};

}  // namespace zm::platform
