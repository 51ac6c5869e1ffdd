/// The plain drawing: figures without coverage, by the same raster as the vector graphics.

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <new>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/drawing.h"
#include "engine/platform/linux/drawing_raster_p.h"
#include "engine/platform/linux/drawing_text_p.h"

namespace zm::platform {
namespace {

enum TPlainPenStyle : std::uint8_t { ppDash = 1, ppDashDotDot = 4, ppNone = 5, ppInside = 6 };
enum TPlainBrushStyle : std::uint8_t { pbSolid, pbNone, pbFirstHatch };

/// Pixels of lines one pixel wide that are drawn and left out in turn.
constexpr std::array<std::array<std::int32_t, 6>, 4> kDashes = {{
    {18, 6, 18, 6, 18, 6},
    {3, 3, 3, 3, 3, 3},
    {9, 6, 3, 6, 0, 0},
    {9, 3, 3, 3, 3, 3},
}};

bool IsDashOn(std::uint8_t style, std::int64_t step) {
    if (style < ppDash || style > ppDashDotDot) {
        return true;
    }
    const auto& dashes = kDashes[static_cast<std::size_t>(style - ppDash)];
    std::int32_t total = 0;
    for (const std::int32_t length : dashes) {
        total += length;
    }
    auto rest = static_cast<std::int32_t>(step % total);
    for (std::size_t i = 0; i < dashes.size(); ++i) {
        if (rest < dashes[i]) {
            return i % 2 == 0;
        }
        rest -= dashes[i];
    }
    return true;
}

struct TPixel {
    std::int64_t x = 0;
    std::int64_t y = 0;
};

/// Sets the pixels of a line in a tile, the last one left out. Those of other tiles are skipped
/// by arithmetic, so that a line is the same whatever tiles it crosses.
void DrawThinLine(const TTile& tile, TPixel from, TPixel to, std::uint8_t style,
                  std::int64_t& dash_step) {
    const std::int64_t dx = to.x - from.x;
    const std::int64_t dy = to.y - from.y;
    const bool is_flat = std::abs(dx) >= std::abs(dy);
    const std::int64_t length = std::max(std::abs(dx), std::abs(dy));
    const std::int64_t start = is_flat ? from.x : from.y;
    const bool is_forward = (is_flat ? dx : dy) >= 0;
    const std::int64_t low = is_flat ? tile.area.left : tile.area.top;
    const std::int64_t high = is_flat ? tile.area.right : tile.area.bottom;
    const std::int64_t first =
        std::max<std::int64_t>(is_forward ? low - start : start - high + 1, 0);
    const std::int64_t last = std::min(is_forward ? high - start : start - low + 1, length);
    for (std::int64_t i = first; i < last; ++i) {
        const double share = static_cast<double>(i) / static_cast<double>(length);
        const std::int64_t across = RoundHalfEven(share * static_cast<double>(is_flat ? dy : dx));
        const std::int64_t along = is_forward ? i : -i;
        const TPixel pixel{from.x + (is_flat ? along : across),
                           from.y + (is_flat ? across : along)};
        if (pixel.x >= tile.area.left && pixel.x < tile.area.right && pixel.y >= tile.area.top &&
            pixel.y < tile.area.bottom && IsDashOn(style, dash_step + i)) {
            tile.mask[(pixel.y - tile.area.top) * tile.mask_stride + pixel.x - tile.area.left] =
                255;
        }
    }
    dash_step += length;
}

TPixel PixelOf(const TDevicePoint& point) {
    return {RoundHalfEven(point.x), RoundHalfEven(point.y)};
}

void DrawThinFigures(const TTile& tile, const std::vector<TPolyline>& figures, std::uint8_t style) {
    for (const TPolyline& figure : figures) {
        std::int64_t dash_step = 0;
        for (std::size_t i = 1; i < figure.points.size(); ++i) {
            DrawThinLine(tile, PixelOf(figure.points[i - 1]), PixelOf(figure.points[i]), style,
                         dash_step);
        }
        if (figure.is_closed) {
            DrawThinLine(tile, PixelOf(figure.points.back()), PixelOf(figure.points.front()), style,
                         dash_step);
        }
    }
}

bool IsHatchLine(std::uint8_t style, std::int32_t x, std::int32_t y) {
    const bool is_falling = (x & 7) == (y & 7);
    const bool is_rising = (x & 7) + (y & 7) == 7;
    switch (style - pbFirstHatch) {
        case 0: return (y & 7) == 0;
        case 1: return (x & 7) == 0;
        case 2: return is_falling;
        case 3: return is_rising;
        case 4: return (x & 7) == 0 || (y & 7) == 0;
        default: return is_falling || is_rising;
    }
}

/// Takes what lies between the lines of a hatch out of a mask.
void HatchMask(const TTile& tile, std::uint8_t style) {
    for (std::int32_t y = tile.area.top; y < tile.area.bottom; ++y) {
        std::uint8_t* const row = tile.mask + std::ptrdiff_t{y - tile.area.top} * tile.mask_stride;
        for (std::int32_t x = tile.area.left; x < tile.area.right; ++x) {
            if (!IsHatchLine(style, x, y)) {
                row[x - tile.area.left] = 0;
            }
        }
    }
}

TRect Sorted(const TRect& rect) {
    return {std::min(rect.left, rect.right), std::min(rect.top, rect.bottom),
            std::max(rect.left, rect.right), std::max(rect.top, rect.bottom)};
}

/// What an outline within a rectangle runs along: the last column and row are its own.
TDeviceBox FrameOf(const TRect& rect, double inset) {
    const TDeviceBox box = BoxOf(Sorted(rect));
    return {box.left + inset, box.top + inset, box.right - 1 - inset, box.bottom - 1 - inset};
}

bool IsFrame(const TDeviceBox& box) {
    return box.left <= box.right && box.top <= box.bottom;
}

std::u16string OnOneLine(std::u16string_view text) {
    std::u16string line(text);
    for (char16_t& unit : line) {
        if (unit == u'\n' || unit == u'\r') {
            unit = u' ';
        }
    }
    return line;
}

class TLinuxPlainCanvas : public TPlatformCanvas {
public:
    TLinuxPlainCanvas(const TDrawTarget& target, const TDrawingLibrary& library)
        : raster_(target, library) {}
    bool IsValid() const { return raster_.IsValid(); }

    void MoveTo(std::int32_t x, std::int32_t y) override { state_.position = {x, y}; }
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
    void SaveState() override { saved_.push_back(state_); }
    void RestoreState() override;
    TPoint TextExtent(std::u16string_view text, const TDrawFont& font) override;
    void TextOut(std::int32_t x, std::int32_t y, std::u16string_view text, const TDrawFont& font,
                 TColor color, const TColor* background, const TRect* clip) override;
    void TextInRect(const TRect& rect, std::u16string_view text, const TDrawFont& font,
                    TColor color, const TPlainTextLayout& layout) override;
    void* DeviceContext() const override { return nullptr; }

private:
    struct TState {
        TPoint position;
        std::int64_t origin_x = 0;
        std::int64_t origin_y = 0;
    };

    TOutline MakeOutline() const {
        return TOutline({1, 0, 0, 1, static_cast<double>(state_.origin_x),
                         static_cast<double>(state_.origin_y)});
    }
    void Fill(const TPlainPen& pen, const TPlainBrush& brush, const TOutline& outline);
    void Stroke(const TPlainPen& pen, const TOutline& outline);
    void FillAndStroke(const TPlainPen& pen, const TPlainBrush& brush, const TOutline& outline);
    TTextEngine* Engine();
    void DrawText(const TTextRequest& request, TDevicePoint place, TColor color,
                  const TDeviceBox& clip, double line_width, TTextPlace line_place);

    TRaster raster_;
    TState state_;
    std::vector<TState> saved_;
    TTextEngineLease engine_;
};

TArgb OpaqueColor(TColor color) {
    return MakeArgb(255, RGBFromColor(color));
}

TSweep SweepBetween(const TDeviceBox& frame, TPoint start, TPoint end) {
    return platform::SweepBetween(frame, {double(start.x), double(start.y)},
                                  {double(end.x), double(end.y)});
}

// Figures.

void TLinuxPlainCanvas::Fill(const TPlainPen& pen, const TPlainBrush& brush,
                             const TOutline& outline) {
    const auto bounds = outline.Bounds();
    if (!bounds || brush.style == pbNone) {
        return;
    }
    TSolidPaint paint(OpaqueColor(brush.color));
    raster_.Paint(*bounds, paint, kPlainFirst + pen.mode, [&](const TTile& tile) {
        const bool is_filled =
            FillFigures(raster_.Library(), tile, outline.Figures(), TMaskEdges::kHard);
        if (brush.style >= pbFirstHatch) {
            HatchMask(tile, brush.style);
        }
        return is_filled;
    });
}

void TLinuxPlainCanvas::Stroke(const TPlainPen& pen, const TOutline& outline) {
    const auto bounds = outline.Bounds();
    if (!bounds || pen.style == ppNone) {
        return;
    }
    constexpr std::int32_t kMostWidth = 100000;
    const double width = std::clamp(pen.width, 1, kMostWidth);
    TSolidPaint paint(OpaqueColor(pen.color));
    raster_.Paint(Enlarge(*bounds, width + 1), paint, kPlainFirst + pen.mode,
                  [&](const TTile& tile) {
                      if (width <= 1) {
                          DrawThinFigures(tile, outline.Figures(), pen.style);
                          return true;
                      }
                      constexpr double kPixelMiddle = 0.5;
                      const TDrawingLibrary& library = raster_.Library();
                      const TDeviceBox near = Enlarge(BoxOf(tile.area), kCutMargin);
                      AddFigures(library, tile, CutLines(outline.Figures(), near), kPixelMiddle);
                      library.cairo_set_antialias(tile.cairo, CAIRO_ANTIALIAS_NONE);
                      library.cairo_set_line_width(tile.cairo, width);
                      library.cairo_set_line_cap(tile.cairo, CAIRO_LINE_CAP_ROUND);
                      library.cairo_set_line_join(tile.cairo, CAIRO_LINE_JOIN_ROUND);
                      library.cairo_stroke(tile.cairo);
                      return true;
                  });
}

void TLinuxPlainCanvas::FillAndStroke(const TPlainPen& pen, const TPlainBrush& brush,
                                      const TOutline& outline) {
    Fill(pen, brush, outline);
    Stroke(pen, outline);
}

/// How far a pen that stays within the frame moves the outline inward.
double InsetOf(const TPlainPen& pen) {
    return pen.style == ppInside && pen.width > 1 ? pen.width / 2 : 0;
}

void TLinuxPlainCanvas::LineTo(const TPlainPen& pen, std::int32_t x, std::int32_t y) {
    const TPoint points[] = {state_.position, {x, y}};
    Polyline(pen, points);
    state_.position = {x, y};
}

void TLinuxPlainCanvas::Polyline(const TPlainPen& pen, std::span<const TPoint> points) try {
    TOutline outline = MakeOutline();
    for (const TPoint& point : points) {
        outline.AddPoint(point.x, point.y);
    }
    Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return;  // a device that fails draws nothing, here and below
}

void TLinuxPlainCanvas::Polygon(const TPlainPen& pen, const TPlainBrush& brush,
                                std::span<const TPoint> points) try {
    TOutline outline = MakeOutline();
    for (const TPoint& point : points) {
        outline.AddPoint(point.x, point.y);
    }
    outline.CloseFigure();
    FillAndStroke(pen, brush, outline);
} catch (const std::bad_alloc&) {
    return;
}

void TLinuxPlainCanvas::FillRect(const TPlainBrush& brush, const TRect& rect) try {
    TOutline outline = MakeOutline();
    outline.AddRectangle(BoxOf(rect));
    Fill(TPlainPen{}, brush, outline);
} catch (const std::bad_alloc&) {
    return;
}

void TLinuxPlainCanvas::Rectangle(const TPlainPen& pen, const TPlainBrush& brush,
                                  const TRect& rect) {
    RoundRect(pen, brush, rect, 0, 0);
}

void TLinuxPlainCanvas::Ellipse(const TPlainPen& pen, const TPlainBrush& brush,
                                const TRect& rect) try {
    const TDeviceBox frame = FrameOf(rect, InsetOf(pen));
    TOutline outline = MakeOutline();
    if (IsFrame(frame)) {
        outline.AddEllipse(frame);
    }
    FillAndStroke(pen, brush, outline);
} catch (const std::bad_alloc&) {
    return;
}

void TLinuxPlainCanvas::RoundRect(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect,
                                  std::int32_t corner_width, std::int32_t corner_height) try {
    const TDeviceBox frame = FrameOf(rect, InsetOf(pen));
    if (!IsFrame(frame)) {
        return;
    }
    TOutline outline = MakeOutline();
    outline.AddRoundRect(frame, corner_width, corner_height);
    FillAndStroke(pen, brush, outline);
} catch (const std::bad_alloc&) {
    return;
}

void TLinuxPlainCanvas::Pie(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect,
                            TPoint start, TPoint end) try {
    const TDeviceBox frame = FrameOf(rect, 0);
    TOutline outline = MakeOutline();
    if (IsFrame(frame)) {
        const TSweep angles = SweepBetween(frame, start, end);
        outline.AddPie(frame, angles.start, angles.sweep);
    }
    FillAndStroke(pen, brush, outline);
} catch (const std::bad_alloc&) {
    return;
}

void TLinuxPlainCanvas::Arc(const TPlainPen& pen, const TRect& rect, TPoint start, TPoint end) try {
    const TDeviceBox frame = FrameOf(rect, 0);
    TOutline outline = MakeOutline();
    if (IsFrame(frame)) {
        const TSweep angles = SweepBetween(frame, start, end);
        outline.AddArc(frame, angles.start, angles.sweep);
    }
    Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return;
}

// State.

void TLinuxPlainCanvas::OffsetViewportOrg(std::int32_t dx, std::int32_t dy) {
    state_.origin_x += dx;
    state_.origin_y += dy;
}

void TLinuxPlainCanvas::RestoreState() {
    if (!saved_.empty()) {
        state_ = saved_.back();
        saved_.pop_back();
    }
}

// Text.

TTextEngine* TLinuxPlainCanvas::Engine() {
    if (engine_ == nullptr) {
        engine_ = TakeTextEngine(raster_.Library());
    }
    return engine_.get();
}

TTextRequest PlainRequest(std::u16string_view text, const TDrawFont& font) {
    TTextRequest request;
    request.text = text;
    request.font = &font;
    request.is_hinted = true;
    request.is_smooth = false;
    return request;
}

TPoint TLinuxPlainCanvas::TextExtent(std::u16string_view text, const TDrawFont& font) try {
    TTextEngine* const engine = Engine();
    if (engine == nullptr || text.empty()) {
        return {};
    }
    const std::u16string line = OnOneLine(text);
    const TDrawSize size = engine->LayOut(PlainRequest(line, font), nullptr, nullptr);
    return {RoundHalfEven(size.width), RoundHalfEven(size.height)};
} catch (const std::bad_alloc&) {
    return {};
}

void TLinuxPlainCanvas::TextOut(std::int32_t x, std::int32_t y, std::u16string_view text,
                                const TDrawFont& font, TColor color, const TColor* background,
                                const TRect* clip) try {
    if (background != nullptr) {
        const TPoint size = TextExtent(text, font);
        const TRect box{x, y, SaturateToInt32(std::int64_t{x} + size.x),
                        SaturateToInt32(std::int64_t{y} + size.y)};
        FillRect({*background, pbSolid}, clip != nullptr ? *clip : box);
    }
    const auto origin_x = static_cast<double>(state_.origin_x);
    const auto origin_y = static_cast<double>(state_.origin_y);
    TDeviceBox bounds = raster_.Bounds();
    if (clip != nullptr) {
        const TDeviceBox box = BoxOf(*clip);
        bounds = Intersect(bounds, {box.left + origin_x, box.top + origin_y, box.right + origin_x,
                                    box.bottom + origin_y});
    }
    const std::u16string line = OnOneLine(text);
    DrawText(PlainRequest(line, font), {x + origin_x, y + origin_y}, color, bounds, 0, tpNear);
} catch (const std::bad_alloc&) {
    return;
}

void TLinuxPlainCanvas::TextInRect(const TRect& rect, std::u16string_view text,
                                   const TDrawFont& font, TColor color,
                                   const TPlainTextLayout& layout) try {
    TTextEngine* const engine = Engine();
    if (engine == nullptr || rect.left >= rect.right || rect.top >= rect.bottom) {
        return;
    }
    const std::u16string line = layout.is_wrapped ? std::u16string(text) : OnOneLine(text);
    TTextRequest request = PlainRequest(line, font);
    const auto width = static_cast<double>(std::int64_t{rect.right} - rect.left);
    const auto height = static_cast<double>(std::int64_t{rect.bottom} - rect.top);
    request.max_width = layout.is_wrapped ? width : 0;
    TDevicePoint place{rect.left + static_cast<double>(state_.origin_x),
                       rect.top + static_cast<double>(state_.origin_y)};
    const TDeviceBox clip =
        Intersect(raster_.Bounds(), {place.x, place.y, place.x + width, place.y + height});
    if (layout.vertical != tpNear) {
        const double room = height - engine->LayOut(request, nullptr, nullptr).height;
        place.y += layout.vertical == tpFar ? room : std::floor(room / 2);
    }
    DrawText(request, place, color, clip, width, layout.horizontal);
} catch (const std::bad_alloc&) {
    return;
}

/// Draws a text from a point on, each line placed within a width.
void TLinuxPlainCanvas::DrawText(const TTextRequest& request, TDevicePoint place, TColor color,
                                 const TDeviceBox& clip, double line_width, TTextPlace line_place) {
    TTextEngine* const engine = Engine();
    if (engine == nullptr || clip.IsEmpty()) {
        return;
    }
    TSolidPaint paint(OpaqueColor(color));
    // Only the vertical reach is known before lines are placed.
    const TDeviceBox visible{-kCutMargin * kCutMargin, clip.top - place.y, kCutMargin * kCutMargin,
                             clip.bottom - place.y};
    raster_.Paint(clip, paint, kPlainFirst + TPlainPen{}.mode, [&](const TTile& tile) {
        engine->LayOut(request, &visible, [&](const TTextPiece& piece) {
            const double room = line_width - piece.width;
            const double shift = line_place == tpNear  ? 0
                                 : line_place == tpFar ? room
                                                       : std::floor(room / 2);
            engine->DrawPiece(
                tile.cairo, piece,
                {1, 0, 0, 1, place.x + shift - tile.area.left, place.y - tile.area.top});
        });
        return true;
    });
}

}  // namespace

std::unique_ptr<TPlatformCanvas> CreatePlatformCanvas(const TDrawTarget& target) {
    const TDrawingLibrary* const library = LoadDrawingLibrary();
    if (library == nullptr) {
        return nullptr;
    }
    std::unique_ptr<TLinuxPlainCanvas> canvas(new (std::nothrow)
                                                  TLinuxPlainCanvas(target, *library));
    return canvas != nullptr && canvas->IsValid() ? std::move(canvas) : nullptr;
}

}  // namespace zm::platform
