#pragma once

#include <memory>
#include <optional>
#include <span>
#include <vector>

#include "engine/platform/drawing.h"
#include "engine/platform/drawing_path_p.h"
#include "engine/platform/linux/drawing_raster_p.h"
#include "engine/platform/linux/drawing_text_p.h"

/// The vector library's side of the seam: records, matrices and clipping lead to figures in device
/// pixels, whose coverage the raster lays on the target.
namespace zm::platform {

class TLinuxPen : public TVectorPen {
public:
    explicit TLinuxPen(const TVectorPenRecord& values) : record(values) {}
    const TVectorPenRecord record;
};

class TLinuxBrush : public TVectorBrush {
public:
    explicit TLinuxBrush(const TVectorBrushRecord& values) : record(values) {}
    const TVectorBrushRecord record;
};

class TLinuxGraphics : public TVectorGraphics {
public:
    TLinuxGraphics(const TDrawTarget& target, const TDrawingLibrary& library)
        : raster_(target, library) {}
    bool IsValid() const { return raster_.IsValid(); }

    bool SetSmoothingMode(std::int32_t mode) override;
    bool SetTextRenderingHint(std::int32_t hint) override;
    bool SetInterpolationMode(std::int32_t mode) override;
    bool SetCompositingMode(std::int32_t mode) override;
    bool SetCompositingQuality(std::int32_t quality) override;

    bool DrawLine(const TVectorPen& pen, TDrawPoint from, TDrawPoint to) override;
    bool DrawLines(const TVectorPen& pen, std::span<const TDrawPoint> points) override;
    bool DrawPath(const TVectorPen& pen, const TDrawPath& path) override;
    bool DrawRectangle(const TVectorPen& pen, const TDrawRect& rect) override;
    bool DrawEllipse(const TVectorPen& pen, const TDrawRect& rect) override;
    bool DrawPolygon(const TVectorPen& pen, std::span<const TDrawPoint> points) override;
    bool DrawPie(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                 float sweep_angle) override;
    bool DrawArc(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                 float sweep_angle) override;

    bool FillPath(const TVectorBrush& brush, const TDrawPath& path) override;
    bool FillRectangle(const TVectorBrush& brush, const TDrawRect& rect) override;
    bool FillEllipse(const TVectorBrush& brush, const TDrawRect& rect) override;
    bool FillPolygon(const TVectorBrush& brush, std::span<const TDrawPoint> points) override;
    bool FillPie(const TVectorBrush& brush, const TDrawRect& rect, float start_angle,
                 float sweep_angle) override;

    bool RotateTransform(float angle) override;
    bool TranslateTransform(float dx, float dy) override;
    bool ScaleTransform(float sx, float sy) override;
    bool ResetTransform() override;
    bool SetTransform(const TDrawMatrix& matrix) override;
    TDrawMatrix GetTransform() const override;
    bool SetClipRect(const TDrawRect& rect) override;
    bool ResetClip() override;

    bool DrawMetafile(const TDrawMetafile& metafile, const TDrawRect& rect) override;
    bool Flush() override { return true; }

    std::optional<TDrawSize> MeasureString(std::u16string_view text, const TDrawFont& font,
                                           TTextFormat format, const TDrawRect& layout) override;
    bool DrawString(std::u16string_view text, const TDrawFont& font, TTextFormat format,
                    const TDrawRect& layout, TArgb color) override;
    TRect TouchedRect() const override { return raster_.TouchedRect(); }

private:
    friend class TMetafilePlayer;  // draws figures of its own making
    bool Fill(const TVectorBrushRecord& brush, const TOutline& outline, cairo_fill_rule_t rule);
    bool Fill(const TVectorBrush& brush, const TOutline& outline);
    bool Stroke(const TVectorPenRecord& pen, const TOutline& outline);
    bool Stroke(const TVectorPen& pen, const TOutline& outline);
    bool StrokeTile(const TVectorPenRecord& pen, double width,
                    const std::vector<TPolyline>& figures, const TTile& tile);
    bool Concatenate(const TDeviceMatrix& step);
    TDeviceBox ClipBox() const;
    void ApplyClip(const TTile& tile);
    TMaskEdges Edges() const;
    TTextEngine* Engine();
    TTextRequest MakeRequest(std::u16string_view text, const TDrawFont& font, TTextFormat format,
                             const TDrawRect& layout) const;
    struct TPlacedText;
    bool DrawPlacedText(const TPlacedText& text);

    TRaster raster_;
    TDeviceMatrix world_;
    std::optional<std::vector<TPolyline>> clip_;
    std::int32_t smoothing_ = 0;
    std::int32_t text_hint_ = 0;
    TCombining combining_ = kCombineOver;
    TTextEngineLease engine_;
};

}  // namespace zm::platform
