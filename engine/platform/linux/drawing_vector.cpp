#include "engine/platform/linux/drawing_vector_p.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <numbers>

#include "engine/foundation/zmnumbers.h"

namespace zm::platform {
namespace {

constexpr double kMiterLimit = 10;
constexpr std::uint8_t kMiterJoin = 0;
constexpr double kMostPenWidth = 100000;

bool IsFinite(const TDrawRect& rect) {
    return std::isfinite(rect.x) && std::isfinite(rect.y) && std::isfinite(rect.width) &&
           std::isfinite(rect.height);
}

/// Line hatches on tiles of 8 by 8 pixels that begin at the target's corner.
class THatchPaint : public TPaint {
public:
    explicit THatchPaint(const TVectorBrushRecord& record) : record_(record) {}
    void ReadRow(std::int32_t x, std::int32_t y, std::int32_t count, TArgb* colors) override {
        for (std::int32_t i = 0; i < count; ++i) {
            colors[i] = IsLine((x + i) & 7, y & 7) ? record_.color : record_.back_color;
        }
    }

private:
    bool IsLine(std::int32_t x, std::int32_t y) const {
        const bool is_falling = x == y;
        const bool is_rising = x + y == 7;
        switch (record_.hatch) {
            case 0: return y == 0;
            case 1: return x == 0;
            case 2: return is_falling;
            case 3: return is_rising;
            case 4: return x == 0 || y == 0;
            default: return is_falling || is_rising;
        }
    }
    const TVectorBrushRecord record_;
};

/// Colours along a line, there and back again beyond its ends.
class TLinearPaint : public TPaint {
public:
    TLinearPaint(const TVectorBrushRecord& record, const TDeviceMatrix& to_world)
        : record_(record), to_world_(to_world) {}
    void ReadRow(std::int32_t x, std::int32_t y, std::int32_t count, TArgb* colors) override {
        const double dx = double{record_.point2.x} - record_.point1.x;
        const double dy = double{record_.point2.y} - record_.point1.y;
        const double length_squared = dx * dx + dy * dy;
        for (std::int32_t i = 0; i < count; ++i) {
            const TDevicePoint p = to_world_.Map(static_cast<double>(x) + i, y);
            colors[i] = At(((p.x - record_.point1.x) * dx + (p.y - record_.point1.y) * dy) /
                           length_squared);
        }
    }

private:
    TArgb At(double place) const {
        const double in_pair = place - 2 * std::floor(place / 2);
        const double share = in_pair > 1 ? 2 - in_pair : in_pair;
        TArgb result = 0;
        for (int shift = 0; shift < 32; shift += 8) {
            const double from = (record_.color >> shift) & 255;
            const double to = (record_.back_color >> shift) & 255;
            const std::uint8_t value = Clamp8(RoundHalfEven(from + (to - from) * share));
            result |= static_cast<TArgb>(value) << shift;
        }
        return result;
    }
    const TVectorBrushRecord record_;
    const TDeviceMatrix to_world_;
};

/// Nil when the world cannot be undone: nothing of it is visible then.
std::unique_ptr<TPaint> MakePaint(const TVectorBrushRecord& record, const TDeviceMatrix& world) {
    if (record.kind == vbHatch) {
        return std::make_unique<THatchPaint>(record);
    }
    if (record.kind == vbSolid) {
        return std::make_unique<TSolidPaint>(record.color);
    }
    const auto inverse = world.Inverse();
    return inverse ? std::make_unique<TLinearPaint>(record, *inverse) : nullptr;
}

cairo_line_join_t LineJoinOf(std::uint8_t join) {
    return join == 1   ? CAIRO_LINE_JOIN_BEVEL
           : join == 2 ? CAIRO_LINE_JOIN_ROUND
                       : CAIRO_LINE_JOIN_MITER;
}

/// Lengths of a dash, in widths of the pen; none for a solid line.
std::vector<double> DashesOf(std::uint8_t dash, double width) {
    std::vector<double> dashes;
    switch (dash) {
        case 1: dashes = {3, 1}; break;
        case 2: dashes = {1, 1}; break;
        case 3: dashes = {3, 1, 1, 1}; break;
        case 4: dashes = {3, 1, 1, 1, 1, 1}; break;
        default: break;
    }
    for (double& length : dashes) {
        length *= width;
    }
    return dashes;
}

/// What a miter that is too long keeps: the corner up to the limit, cut across there. The library
/// below has no such join and leaves a bevel. Nothing for other corners, and where a line turns
/// back on itself, which has no outer side.
std::optional<TPolyline> ClippedMiter(const TDevicePoint& before, const TDevicePoint& corner,
                                      const TDevicePoint& after, double half_width) {
    const double length_in = std::hypot(corner.x - before.x, corner.y - before.y);
    const double length_out = std::hypot(after.x - corner.x, after.y - corner.y);
    const TDevicePoint in{(corner.x - before.x) / length_in, (corner.y - before.y) / length_in};
    const TDevicePoint out{(after.x - corner.x) / length_out, (after.y - corner.y) / length_out};
    const double turn = in.x * out.y - in.y * out.x;
    // The sine of half the angle between the lines.
    const double half_sine = std::sqrt(std::max((1 + in.x * out.x + in.y * out.y) / 2, 0.0));
    if (!(length_in > 0 && length_out > 0) || turn == 0 || half_sine * kMiterLimit >= 1) {
        return std::nullopt;
    }
    const double side = turn > 0 ? half_width : -half_width;
    const TDevicePoint first{corner.x + in.y * side, corner.y - in.x * side};
    const TDevicePoint last{corner.x + out.y * side, corner.y - out.x * side};
    const double across = std::hypot(in.x - out.x, in.y - out.y);
    const TDevicePoint outward{(in.x - out.x) / across, (in.y - out.y) / across};
    const double depth = (first.x - corner.x) * outward.x + (first.y - corner.y) * outward.y;
    const double reach = (kMiterLimit * half_width - depth) / (in.x * outward.x + in.y * outward.y);
    TPolyline part{{corner,
                    first,
                    {first.x + in.x * reach, first.y + in.y * reach},
                    {last.x - out.x * reach, last.y - out.y * reach},
                    last},
                   /*is_closed=*/true};
    if (turn < 0) {
        std::reverse(part.points.begin(), part.points.end());
    }
    return part;
}

std::vector<TPolyline> ClippedMiters(const std::vector<TPolyline>& figures, double half_width) {
    std::vector<TPolyline> parts;
    for (const TPolyline& figure : figures) {
        const auto& points = figure.points;
        const std::size_t count = points.size();
        const std::size_t first = figure.is_closed ? 0 : 1;
        const std::size_t end = figure.is_closed ? count : count - 1;
        for (std::size_t i = first; count > 2 && i < end; ++i) {
            if (auto part = ClippedMiter(points[(i + count - 1) % count], points[i],
                                         points[(i + 1) % count], half_width)) {
                parts.push_back(std::move(*part));
            }
        }
    }
    return parts;
}

}  // namespace

// Making.

std::unique_ptr<TVectorPen> CreateVectorPen(const TVectorPenRecord& record) {
    if (!IsVectorGraphicsBound() || !std::isfinite(record.width)) {
        return nullptr;
    }
    return std::unique_ptr<TVectorPen>(new (std::nothrow) TLinuxPen(record));
}

std::unique_ptr<TVectorBrush> CreateVectorBrush(const TVectorBrushRecord& record) {
    constexpr std::uint8_t kHatchCount = 6;
    const auto& [x1, y1] = record.point1;
    const auto& [x2, y2] = record.point2;
    const bool is_line = std::isfinite(x1 + y1 + x2 + y2) && (x1 != x2 || y1 != y2);
    if (!IsVectorGraphicsBound() || (record.kind == vbLinear && !is_line) ||
        (record.kind == vbHatch && record.hatch >= kHatchCount)) {
        return nullptr;
    }
    return std::unique_ptr<TVectorBrush>(new (std::nothrow) TLinuxBrush(record));
}

std::unique_ptr<TVectorGraphics> CreateVectorGraphics(const TDrawTarget& target) {
    const TDrawingLibrary* const library = LoadDrawingLibrary();
    if (!IsVectorGraphicsBound() || library == nullptr) {
        return nullptr;
    }
    std::unique_ptr<TLinuxGraphics> graphics(new (std::nothrow) TLinuxGraphics(target, *library));
    return graphics != nullptr && graphics->IsValid() ? std::move(graphics) : nullptr;
}

// Modes.

bool TLinuxGraphics::SetSmoothingMode(std::int32_t mode) {
    const bool is_known = mode >= 0 && mode <= 4;
    smoothing_ = is_known ? mode : smoothing_;
    return is_known;
}

bool TLinuxGraphics::SetTextRenderingHint(std::int32_t hint) {
    const bool is_known = hint >= 0 && hint <= 5;
    text_hint_ = is_known ? hint : text_hint_;
    return is_known;
}

bool TLinuxGraphics::SetInterpolationMode(std::int32_t mode) {
    return mode >= 0 && mode <= 7;  // for pictures, of which there are none here
}

bool TLinuxGraphics::SetCompositingMode(std::int32_t mode) {
    const bool is_known = mode == kCombineOver || mode == kCombineCopy;
    combining_ = is_known ? mode : combining_;
    return is_known;
}

bool TLinuxGraphics::SetCompositingQuality(std::int32_t quality) {
    return quality >= 0 && quality <= 4;  // colours are laid over each other exactly in any case
}

TMaskEdges TLinuxGraphics::Edges() const {
    return smoothing_ == 2 || smoothing_ == 4 ? TMaskEdges::kSmooth : TMaskEdges::kHard;
}

// Transform and clipping.

bool TLinuxGraphics::Concatenate(const TDeviceMatrix& step) {
    const TDeviceMatrix result = world_.After(step);
    if (!result.IsFinite()) {
        return false;
    }
    world_ = result;
    return true;
}

bool TLinuxGraphics::RotateTransform(float angle) {
    const double turn = std::fmod(static_cast<double>(angle), 360.0);
    const double radians = turn * std::numbers::pi / 180;
    double cosine = std::cos(radians);
    double sine = std::sin(radians);
    if (std::fmod(turn, 90.0) == 0) {
        cosine = std::nearbyint(cosine);  // quarter turns keep whole pixels whole
        sine = std::nearbyint(sine);
    }
    return Concatenate({cosine, sine, -sine, cosine, 0, 0});
}

bool TLinuxGraphics::TranslateTransform(float dx, float dy) {
    return Concatenate({1, 0, 0, 1, dx, dy});
}

bool TLinuxGraphics::ScaleTransform(float sx, float sy) {
    return Concatenate({sx, 0, 0, sy, 0, 0});
}

bool TLinuxGraphics::ResetTransform() {
    world_ = {};
    return true;
}

bool TLinuxGraphics::SetTransform(const TDrawMatrix& matrix) {
    const TDeviceMatrix wanted{matrix.m11, matrix.m12, matrix.m21,
                               matrix.m22, matrix.dx,  matrix.dy};
    if (!wanted.IsFinite() || wanted.Determinant() == 0) {
        return false;
    }
    world_ = wanted;
    return true;
}

TDrawMatrix TLinuxGraphics::GetTransform() const {
    return {static_cast<float>(world_.m11), static_cast<float>(world_.m12),
            static_cast<float>(world_.m21), static_cast<float>(world_.m22),
            static_cast<float>(world_.dx),  static_cast<float>(world_.dy)};
}

bool TLinuxGraphics::SetClipRect(const TDrawRect& rect) try {
    TOutline outline(world_);
    outline.AddRectangle(BoxOf(rect));
    if (!IsFinite(rect) || !outline.Bounds()) {
        return false;
    }
    clip_ = outline.Figures();
    return true;
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::ResetClip() {
    clip_.reset();
    return true;
}

TDeviceBox TLinuxGraphics::ClipBox() const {
    TDeviceBox box = raster_.Bounds();
    if (clip_) {
        TDeviceBox inner{box.right, box.bottom, box.left, box.top};
        for (const TDevicePoint& point : clip_->front().points) {
            inner = {std::min(inner.left, point.x), std::min(inner.top, point.y),
                     std::max(inner.right, point.x), std::max(inner.bottom, point.y)};
        }
        box = Intersect(box, inner);
    }
    return box;
}

void TLinuxGraphics::ApplyClip(const TTile& tile) {
    if (clip_) {
        const TDrawingLibrary& library = raster_.Library();
        AddFigures(library, tile, CutPolygons(*clip_, Enlarge(BoxOf(tile.area), kCutMargin)),
                   /*offset=*/0);
        library.cairo_set_antialias(tile.cairo, CAIRO_ANTIALIAS_NONE);
        library.cairo_clip(tile.cairo);
    }
}

// Fills.

bool TLinuxGraphics::Fill(const TVectorBrush& brush, const TOutline& outline) {
    return Fill(static_cast<const TLinuxBrush&>(brush).record, outline, CAIRO_FILL_RULE_EVEN_ODD);
}

bool TLinuxGraphics::Fill(const TVectorBrushRecord& brush, const TOutline& outline,
                          cairo_fill_rule_t rule) {
    const auto bounds = outline.Bounds();
    if (!bounds) {
        return outline.Figures().empty();
    }
    const auto paint = MakePaint(brush, world_);
    return paint != nullptr &&
           raster_.Paint(Intersect(*bounds, ClipBox()), *paint, combining_, [&](const TTile& tile) {
               ApplyClip(tile);
               return FillFigures(raster_.Library(), tile, outline.Figures(), Edges(), rule);
           });
}

bool TLinuxGraphics::FillPath(const TVectorBrush& brush, const TDrawPath& path) try {
    TOutline outline(world_);
    outline.AddPath(path);
    return Fill(brush, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::FillRectangle(const TVectorBrush& brush, const TDrawRect& rect) try {
    TOutline outline(world_);
    if (rect.width > 0 && rect.height > 0) {
        outline.AddRectangle(BoxOf(rect));
    }
    return Fill(brush, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::FillEllipse(const TVectorBrush& brush, const TDrawRect& rect) try {
    TOutline outline(world_);
    if (rect.width > 0 && rect.height > 0) {
        outline.AddEllipse(BoxOf(rect));
    }
    return Fill(brush, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::FillPolygon(const TVectorBrush& brush,
                                 std::span<const TDrawPoint> points) try {
    TOutline outline(world_);
    outline.AddPoints(points);
    return Fill(brush, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::FillPie(const TVectorBrush& brush, const TDrawRect& rect, float start_angle,
                             float sweep_angle) try {
    TOutline outline(world_);
    if (rect.width > 0 && rect.height > 0) {
        outline.AddPie(BoxOf(rect), start_angle, sweep_angle);
    }
    return Fill(brush, outline);
} catch (const std::bad_alloc&) {
    return false;
}

// Lines.

bool TLinuxGraphics::Stroke(const TVectorPen& pen, const TOutline& outline) {
    return Stroke(static_cast<const TLinuxPen&>(pen).record, outline);
}

bool TLinuxGraphics::Stroke(const TVectorPenRecord& record, const TOutline& outline) {
    const auto bounds = outline.Bounds();
    if (!bounds) {
        return outline.Figures().empty();
    }
    const double width = std::clamp(double{record.width}, 1.0, kMostPenWidth);
    const double reach = width / 2 * kMiterLimit + 1;
    TSolidPaint paint(record.color);
    return raster_.Paint(Intersect(Enlarge(*bounds, reach), ClipBox()), paint, combining_,
                         [&](const TTile& tile) {
                             ApplyClip(tile);
                             return StrokeTile(record, width, outline.Figures(), tile);
                         });
}

bool TLinuxGraphics::StrokeTile(const TVectorPenRecord& pen, double width,
                                const std::vector<TPolyline>& figures, const TTile& tile) {
    constexpr double kPixelMiddle = 0.5;
    const TDrawingLibrary& library = raster_.Library();
    const auto lines = CutLines(figures, Enlarge(BoxOf(tile.area), kCutMargin));
    AddFigures(library, tile, lines, kPixelMiddle);
    library.cairo_set_antialias(
        tile.cairo, Edges() == TMaskEdges::kSmooth ? CAIRO_ANTIALIAS_GRAY : CAIRO_ANTIALIAS_NONE);
    library.cairo_set_line_width(tile.cairo, width);
    library.cairo_set_line_cap(tile.cairo, CAIRO_LINE_CAP_BUTT);
    library.cairo_set_line_join(tile.cairo, LineJoinOf(pen.join));
    library.cairo_set_miter_limit(tile.cairo, kMiterLimit);
    const std::vector<double> dashes = DashesOf(pen.dash, width);
    library.cairo_set_dash(tile.cairo, dashes.data(), static_cast<int>(dashes.size()), 0);
    library.cairo_stroke(tile.cairo);
    if (pen.join == kMiterJoin && dashes.empty()) {
        AddFigures(library, tile, ClippedMiters(lines, width / 2), kPixelMiddle);
        library.cairo_set_fill_rule(tile.cairo, CAIRO_FILL_RULE_WINDING);
        library.cairo_fill(tile.cairo);
    }
    return true;
}

bool TLinuxGraphics::DrawLine(const TVectorPen& pen, TDrawPoint from, TDrawPoint to) {
    const TDrawPoint points[] = {from, to};
    return DrawLines(pen, points);
}

bool TLinuxGraphics::DrawLines(const TVectorPen& pen, std::span<const TDrawPoint> points) try {
    TOutline outline(world_);
    outline.AddPoints(points);
    return Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::DrawPath(const TVectorPen& pen, const TDrawPath& path) try {
    TOutline outline(world_);
    outline.AddPath(path);
    return Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::DrawRectangle(const TVectorPen& pen, const TDrawRect& rect) try {
    TOutline outline(world_);
    if (rect.width >= 0 && rect.height >= 0) {
        outline.AddRectangle(BoxOf(rect));
    }
    return Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::DrawEllipse(const TVectorPen& pen, const TDrawRect& rect) try {
    TOutline outline(world_);
    if (rect.width >= 0 && rect.height >= 0) {
        outline.AddEllipse(BoxOf(rect));
    }
    return Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::DrawPolygon(const TVectorPen& pen, std::span<const TDrawPoint> points) try {
    TOutline outline(world_);
    outline.AddPoints(points);
    outline.CloseFigure();
    return Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::DrawPie(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                             float sweep_angle) try {
    TOutline outline(world_);
    if (rect.width >= 0 && rect.height >= 0) {
        outline.AddPie(BoxOf(rect), start_angle, sweep_angle);
    }
    return Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return false;
}

bool TLinuxGraphics::DrawArc(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                             float sweep_angle) try {
    TOutline outline(world_);
    if (rect.width >= 0 && rect.height >= 0) {
        outline.AddArc(BoxOf(rect), start_angle, sweep_angle);
    }
    return Stroke(pen, outline);
} catch (const std::bad_alloc&) {
    return false;
}

}  // namespace zm::platform
