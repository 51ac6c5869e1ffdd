#pragma once

#include <algorithm>
#include <functional>
#include <memory>
#include <new>
#include <stdexcept>

#include "engine/platform/drawing.h"
#include "engine/platform/drawing_path_p.h"
#include "engine/platform/win32/gdiplus_binding_p.h"

namespace zm::platform {

/// The pen's width is kept for the limits of what it draws; the kinds of brushes have one base.
class TGdiPlusVectorPen final : public TVectorPen {
public:
    TGdiPlusPen pen;
    float width = 1;
};

class TGdiPlusVectorBrush final : public TVectorBrush {
public:
    TGdiPlusBrushOf<Gdiplus::GpSolidFill> solid;
    TGdiPlusBrushOf<Gdiplus::GpHatch> hatch;
    TGdiPlusBrushOf<Gdiplus::GpLineGradient> linear;

    Gdiplus::GpBrush* Get() const {
        if (solid.IsSet()) {
            return solid.Get();
        }
        return hatch.IsSet() ? static_cast<Gdiplus::GpBrush*>(hatch.Get()) : linear.Get();
    }
};

class TGdiPlusMetafile final : public TDrawMetafile {
public:
    TDrawMetafileHeader Header() const override { return header; }

    TGdiPlusImageOf<Gdiplus::GpMetafile> metafile;
    TDrawMetafileHeader header;
};

/// Lack of memory is a failure like any other.
template <typename TWork>
bool SucceedsInMemory(const TWork& work) {
    try {
        return work();
    } catch (const std::bad_alloc&) {
        return false;
    } catch (const std::length_error&) {
        return false;
    }
}

/// Where a font has its baseline below the top of a line, and its underline and strike-out above
/// the baseline, with their thickness, in pixels.
struct TFontLines {
    double ascent = 0;
    double underline = 0;
    double underline_size = 0;
    double strike_out = 0;
    double strike_out_size = 0;
};

/// Whether the library draws the lines of a font on pictures; it must be bound.
bool LibraryDrawsTextLines();

/// For a call that draws: the plain drawing is complete before, and its origin, which the library
/// would follow in a context, is out of the way.
class TContextScope {
public:
    explicit TContextScope(HDC context) : context_(context) {
        ::GdiFlush();
        if (context_ != nullptr) {
            ::SetViewportOrgEx(context_, 0, 0, &origin_);
        }
    }
    ~TContextScope() {
        if (context_ != nullptr) {
            ::SetViewportOrgEx(context_, origin_.x, origin_.y, nullptr);
        }
    }
    TContextScope(const TContextScope&) = delete;
    TContextScope& operator=(const TContextScope&) = delete;

private:
    HDC context_;
    POINT origin_{};
};

/// TVectorGraphics over the library. Targets of 24 and 32 bits are pictures of the library over
/// the section's own pixels, which gives true alpha; the library has no drawing on palettes, and
/// such targets are drawn on through their device context.
class TGdiPlusDrawing final : public TVectorGraphics {
public:
    explicit TGdiPlusDrawing(const TDrawTarget& target) : target_(target) {}
    bool Open();

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
    TDrawMatrix GetTransform() const override { return matrix_; }

    bool SetClipRect(const TDrawRect& rect) override;
    bool ResetClip() override;

    bool DrawMetafile(const TDrawMetafile& metafile, const TDrawRect& rect) override;
    bool Flush() override;

    std::optional<TDrawSize> MeasureString(std::u16string_view text, const TDrawFont& font,
                                           TTextFormat format, const TDrawRect& layout) override;
    bool DrawString(std::u16string_view text, const TDrawFont& font, TTextFormat format,
                    const TDrawRect& layout, TArgb color) override;

    TRect TouchedRect() const override { return {0, 0, target_.width, target_.height}; }

private:
    /// How far a shape reaches under the world transform.
    enum class TReach : std::uint8_t { kNear, kFar, kNowhere };

    /// A call of the library on these graphics.
    template <auto kEntry, typename... TArguments>
    bool Call(TArguments... arguments) {
        const TGdiPlusEntries* entries = GdiPlus();
        const TContextScope scope(context_);
        return entries != nullptr && graphics_.IsSet() &&
               IsDone((entries->*kEntry)(graphics_.Get(), arguments...));
    }

    bool OpenPicture();
    bool OpenContext();
    bool ReadTransform();

    TDevicePoint ToDevice(TDevicePoint point) const;
    std::optional<TDevicePoint> ToWorld(TDevicePoint point) const;
    double LargestScale() const;
    TDeviceBox Neighbourhood(double margin) const;
    TReach ReachOf(std::span<const TDrawPoint> points) const;
    TReach ReachOf(const TDrawRect& rect) const;
    TReach ReachOf(const TDrawPath& path) const;
    bool PenIsUsable(const TVectorPen& pen) const;
    std::optional<TDeviceBox> ClipBounds() const;

    /// Draw a shape by `call` when it is near; otherwise by the lines that `add` makes of it.
    template <typename TCall, typename TAdd>
    bool Stroke(TReach reach, const TVectorPen& pen, const TCall& call, const TAdd& add);
    template <typename TCall, typename TAdd>
    bool Fill(TReach reach, const TVectorBrush& brush, const TCall& call, const TAdd& add);
    /// An outline that brings what is added to it to the target's pixels, for these two.
    TOutline DeviceOutline() const;
    bool StrokeOutline(const TVectorPen& pen, const TOutline& outline);
    bool FillOutline(const TVectorBrush& brush, const TOutline& outline);
    std::optional<std::vector<Gdiplus::PointF>> WorldPoints(
        const std::vector<TDevicePoint>& points) const;

    /// Lines of a text that are laid out in one go.
    struct TTextPiece {
        std::u16string_view text;
        Gdiplus::RectF rect;  ///< the layout's, at the height of the first line
        TDrawSize size;
        INT fitted = 0;  ///< units of the text that found room
        INT lines = 0;
    };
    /// What is left of the layout's rectangle.
    struct TTextLayout {
        Gdiplus::RectF rect;
        bool has_floor;
        double last_top;  ///< lines that begin below need not be laid out

        bool IsFull() const {
            return (has_floor && rect.Height <= 0) || static_cast<double>(rect.Y) > last_top;
        }
        void MoveDown(float height) {
            rect.Y += height;
            rect.Height = has_floor ? std::max(rect.Height - height, 0.0F) : 0;
        }
    };
    using TPieceWork = std::function<bool(const TTextPiece&)>;

    bool PrepareFont(const TDrawFont& font);
    bool MeasurePiece(std::u16string_view text, const Gdiplus::RectF& rect,
                      const Gdiplus::GpStringFormat* format, TTextPiece& piece);
    bool KeepWholeLines(const Gdiplus::GpStringFormat* format, TTextPiece& piece);
    /// Ends where lines begin more than `reach` below the first.
    bool LayOut(std::u16string_view text, Gdiplus::RectF rect,
                const Gdiplus::GpStringFormat* format, double reach, const TPieceWork& work);
    double ReachFrom(TDevicePoint start) const;
    bool LayOutLine(std::u16string_view line, const Gdiplus::GpStringFormat* format, double reach,
                    TTextLayout& layout, const TPieceWork& work);
    std::u16string_view SeenPart(std::u16string_view line, const Gdiplus::GpStringFormat* format,
                                 double reach);
    /// The whole pixels of the target that a box under the world transform may touch; an empty
    /// box when there are none.
    TDeviceBox SeenBox(const TDrawRect& box) const;
    bool DrawPiece(const TTextPiece& piece, const Gdiplus::GpStringFormat* format, TArgb color);
    bool DrawOn(const TGdiPlusGraphics& graphics, const TTextPiece& piece,
                const Gdiplus::GpStringFormat* format, TArgb color);
    bool DrawSingleBit(const TTextPiece& piece, const Gdiplus::GpStringFormat* format, TArgb color,
                       const TDeviceBox& seen);
    bool DrawTextLines(const TTextPiece& piece, const Gdiplus::GpStringFormat* format, TArgb color);
    bool DrawBar(Gdiplus::GpBrush* brush, float left, float width, double top, double thickness);
    bool PlacePicture(Gdiplus::GpImage* picture, const TDeviceBox& place);

    TDrawTarget target_;
    TDrawMatrix matrix_;
    Gdiplus::TextRenderingHint hint_ = Gdiplus::TextRenderingHintSystemDefault;
    Gdiplus::InterpolationMode interpolation_ = Gdiplus::InterpolationModeDefault;
    bool copies_ = false;
    bool has_clip_ = false;
    HDC context_ = nullptr;  ///< only where the library draws through it
    TGdiPlusImageOf<Gdiplus::GpBitmap> picture_;
    TGdiPlusGraphics graphics_;
    /// The font of the last text; measuring and drawing come in pairs.
    TGdiPlusFont font_;
    TDrawFont font_traits_;
    TFontLines font_lines_;
};

}  // namespace zm::platform
