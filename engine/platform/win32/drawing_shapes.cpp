#include <array>
#include <cmath>

#include "engine/platform/win32/drawing_graphics_p.h"

// Pens, brushes, and the shapes drawn with them.
namespace zm::platform {
namespace {

/// Nothing of a line is seen beyond this many widths of its pen: a miter ends at 5.
constexpr double kPenWidthsSeen = 6;
constexpr double kFillMargin = 64;
/// A wider pen covers any target all the same.
constexpr float kMaxPenWidth = 1 << 18;
constexpr std::uint8_t kLastDash = Gdiplus::DashStyleDashDotDot;
constexpr std::uint8_t kLastJoin = Gdiplus::LineJoinMiterClipped;
constexpr std::uint8_t kLastHatch = Gdiplus::HatchStyleDiagonalCross;

Gdiplus::GpPen* PenOf(const TVectorPen& pen) {
    return static_cast<const TGdiPlusVectorPen&>(pen).pen.Get();
}

Gdiplus::GpBrush* BrushOf(const TVectorBrush& brush) {
    return static_cast<const TGdiPlusVectorBrush&>(brush).Get();
}

std::vector<Gdiplus::PointF> NativePoints(std::span<const TDrawPoint> points) {
    std::vector<Gdiplus::PointF> native;
    native.reserve(points.size());
    for (const TDrawPoint& point : points) {
        native.emplace_back(point.x, point.y);
    }
    return native;
}

bool AddPart(const TGdiPlusEntries& entries, Gdiplus::GpPath* path, const TDrawPathPart& part) {
    switch (part.kind) {
        case pkLine:
            return IsDone(
                entries.GdipAddPathLine(path, part.from.x, part.from.y, part.to.x, part.to.y));
        case pkArc:
            return IsDone(entries.GdipAddPathArc(
                path, part.bounds.x, part.bounds.y, part.bounds.width, part.bounds.height,
                std::fmod(part.start_angle, 360.0F), part.sweep_angle));
        case pkStartFigure: return IsDone(entries.GdipStartPathFigure(path));
        case pkCloseFigure: return IsDone(entries.GdipClosePathFigure(path));
    }
    return false;
}

bool MakePath(const TDrawPath& parts, TGdiPlusPath& path) {
    const TGdiPlusEntries* entries = GdiPlus();
    if (entries == nullptr ||
        !IsDone(entries->GdipCreatePath(Gdiplus::FillModeAlternate, path.Receive()))) {
        return false;
    }
    for (const TDrawPathPart& part : parts) {
        if (!AddPart(*entries, path.Get(), part)) {
            return false;
        }
    }
    return true;
}

}  // namespace

std::unique_ptr<TVectorPen> CreateVectorPen(const TVectorPenRecord& record) {
    const TGdiPlusEntries* entries = GdiPlus();
    if (entries == nullptr || !std::isfinite(record.width)) {
        return nullptr;
    }
    std::unique_ptr<TGdiPlusVectorPen> result(new (std::nothrow) TGdiPlusVectorPen);
    if (result == nullptr) {
        return nullptr;
    }
    result->width = std::min(record.width, kMaxPenWidth);
    const auto dash = record.dash <= kLastDash ? static_cast<Gdiplus::DashStyle>(record.dash)
                                               : Gdiplus::DashStyleSolid;
    const auto join = record.join <= kLastJoin ? static_cast<Gdiplus::LineJoin>(record.join)
                                               : Gdiplus::LineJoinMiter;
    const bool is_made =
        IsDone(entries->GdipCreatePen1(record.color, result->width, Gdiplus::UnitPixel,
                                       result->pen.Receive())) &&
        IsDone(entries->GdipSetPenDashStyle(result->pen.Get(), dash)) &&
        IsDone(entries->GdipSetPenLineJoin(result->pen.Get(), join));
    return is_made ? std::move(result) : nullptr;
}

std::unique_ptr<TVectorBrush> CreateVectorBrush(const TVectorBrushRecord& record) {
    const TGdiPlusEntries* entries = GdiPlus();
    if (entries == nullptr || record.hatch > kLastHatch) {
        return nullptr;
    }
    std::unique_ptr<TGdiPlusVectorBrush> result(new (std::nothrow) TGdiPlusVectorBrush);
    if (result == nullptr) {
        return nullptr;
    }
    const Gdiplus::PointF point1(record.point1.x, record.point1.y);
    const Gdiplus::PointF point2(record.point2.x, record.point2.y);
    const bool is_line = std::isfinite(point1.X + point1.Y + point2.X + point2.Y) &&
                         (point1.X != point2.X || point1.Y != point2.Y);
    Gdiplus::GpStatus status = Gdiplus::InvalidParameter;
    if (record.kind == vbSolid) {
        status = entries->GdipCreateSolidFill(record.color, result->solid.Receive());
    } else if (record.kind == vbHatch) {
        status =
            entries->GdipCreateHatchBrush(static_cast<Gdiplus::HatchStyle>(record.hatch),
                                          record.color, record.back_color, result->hatch.Receive());
    } else if (is_line) {
        status =
            entries->GdipCreateLineBrush(&point1, &point2, record.color, record.back_color,
                                         Gdiplus::WrapModeTileFlipXY, result->linear.Receive());
    }
    return IsDone(status) ? std::move(result) : nullptr;
}

std::optional<std::vector<Gdiplus::PointF>> TGdiPlusDrawing::WorldPoints(
    const std::vector<TDevicePoint>& points) const {
    std::vector<Gdiplus::PointF> world;
    world.reserve(points.size());
    for (const TDevicePoint& point : points) {
        const auto place = ToWorld(point);
        if (!place) {
            return std::nullopt;
        }
        world.emplace_back(static_cast<float>(place->x), static_cast<float>(place->y));
    }
    return world;
}

bool TGdiPlusDrawing::StrokeOutline(const TVectorPen& pen, const TOutline& outline) {
    const double width = static_cast<const TGdiPlusVectorPen&>(pen).width * LargestScale();
    const TDeviceBox box = Neighbourhood(kFillMargin + std::max(width, 1.0) * kPenWidthsSeen);
    for (TPolyline& run : CutLines(outline.Figures(), box)) {
        if (run.is_closed) {
            run.points.push_back(run.points.front());
        }
        const auto world = WorldPoints(run.points);
        if (!world || !Call<&TGdiPlusEntries::GdipDrawLines>(PenOf(pen), world->data(),
                                                             static_cast<INT>(world->size()))) {
            return false;
        }
    }
    return true;
}

bool TGdiPlusDrawing::FillOutline(const TVectorBrush& brush, const TOutline& outline) {
    const TGdiPlusEntries* entries = GdiPlus();
    TGdiPlusPath path;
    if (entries == nullptr ||
        !IsDone(entries->GdipCreatePath(Gdiplus::FillModeAlternate, path.Receive()))) {
        return false;
    }
    for (const TPolyline& figure : CutPolygons(outline.Figures(), Neighbourhood(kFillMargin))) {
        const auto world = WorldPoints(figure.points);
        if (!world) {
            return false;
        }
        if (world->size() >= 3 &&
            (!IsDone(entries->GdipAddPathLine2(path.Get(), world->data(),
                                               static_cast<INT>(world->size()))) ||
             !IsDone(entries->GdipClosePathFigure(path.Get())))) {
            return false;
        }
    }
    return Call<&TGdiPlusEntries::GdipFillPath>(BrushOf(brush), path.Get());
}

template <typename TCall, typename TAdd>
bool TGdiPlusDrawing::Stroke(TReach reach, const TVectorPen& pen, const TCall& call,
                             const TAdd& add) {
    if (reach == TReach::kNowhere || !PenIsUsable(pen)) {
        return false;
    }
    return SucceedsInMemory([&] {
        if (reach == TReach::kNear) {
            return call(PenOf(pen));
        }
        TOutline outline = DeviceOutline();
        add(outline);
        return StrokeOutline(pen, outline);
    });
}

/// Pens run through the middles of pixels, the library's own rule; fills go from edge to edge.
template <typename TCall, typename TAdd>
bool TGdiPlusDrawing::Fill(TReach reach, const TVectorBrush& brush, const TCall& call,
                           const TAdd& add) {
    if (reach == TReach::kNowhere ||
        !Call<&TGdiPlusEntries::GdipSetPixelOffsetMode>(Gdiplus::PixelOffsetModeHalf)) {
        return false;
    }
    const bool is_filled = SucceedsInMemory([&] {
        if (reach == TReach::kNear) {
            return call(BrushOf(brush));
        }
        TOutline outline = DeviceOutline();
        add(outline);
        return FillOutline(brush, outline);
    });
    return Call<&TGdiPlusEntries::GdipSetPixelOffsetMode>(Gdiplus::PixelOffsetModeNone) &&
           is_filled;
}

bool TGdiPlusDrawing::DrawLine(const TVectorPen& pen, TDrawPoint from, TDrawPoint to) {
    const std::array ends = {from, to};
    return Stroke(
        ReachOf(ends), pen,
        [&](Gdiplus::GpPen* native) {
            return Call<&TGdiPlusEntries::GdipDrawLine>(native, from.x, from.y, to.x, to.y);
        },
        [&](TOutline& outline) { outline.AddPoints(ends); });
}

bool TGdiPlusDrawing::DrawLines(const TVectorPen& pen, std::span<const TDrawPoint> points) {
    return Stroke(
        ReachOf(points), pen,
        [&](Gdiplus::GpPen* native) {
            const auto copies = NativePoints(points);
            return Call<&TGdiPlusEntries::GdipDrawLines>(native, copies.data(),
                                                         static_cast<INT>(copies.size()));
        },
        [&](TOutline& outline) { outline.AddPoints(points); });
}

bool TGdiPlusDrawing::DrawPath(const TVectorPen& pen, const TDrawPath& path) {
    return Stroke(
        ReachOf(path), pen,
        [&](Gdiplus::GpPen* native) {
            TGdiPlusPath copy;
            return MakePath(path, copy) && Call<&TGdiPlusEntries::GdipDrawPath>(native, copy.Get());
        },
        [&](TOutline& outline) { outline.AddPath(path); });
}

bool TGdiPlusDrawing::DrawRectangle(const TVectorPen& pen, const TDrawRect& rect) {
    return Stroke(
        ReachOf(rect), pen,
        [&](Gdiplus::GpPen* native) {
            return Call<&TGdiPlusEntries::GdipDrawRectangle>(native, rect.x, rect.y, rect.width,
                                                             rect.height);
        },
        [&](TOutline& outline) { outline.AddRectangle(BoxOf(rect)); });
}

bool TGdiPlusDrawing::DrawEllipse(const TVectorPen& pen, const TDrawRect& rect) {
    return Stroke(
        ReachOf(rect), pen,
        [&](Gdiplus::GpPen* native) {
            return Call<&TGdiPlusEntries::GdipDrawEllipse>(native, rect.x, rect.y, rect.width,
                                                           rect.height);
        },
        [&](TOutline& outline) { outline.AddEllipse(BoxOf(rect)); });
}

bool TGdiPlusDrawing::DrawPolygon(const TVectorPen& pen, std::span<const TDrawPoint> points) {
    return Stroke(
        ReachOf(points), pen,
        [&](Gdiplus::GpPen* native) {
            const auto copies = NativePoints(points);
            return Call<&TGdiPlusEntries::GdipDrawPolygon>(native, copies.data(),
                                                           static_cast<INT>(copies.size()));
        },
        [&](TOutline& outline) {
            outline.AddPoints(points);
            outline.CloseFigure();
        });
}

bool TGdiPlusDrawing::DrawPie(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                              float sweep_angle) {
    return std::isfinite(start_angle + sweep_angle) &&
           Stroke(
               ReachOf(rect), pen,
               [&](Gdiplus::GpPen* native) {
                   return Call<&TGdiPlusEntries::GdipDrawPie>(
                       native, rect.x, rect.y, rect.width, rect.height, start_angle, sweep_angle);
               },
               [&](TOutline& outline) { outline.AddPie(BoxOf(rect), start_angle, sweep_angle); });
}

bool TGdiPlusDrawing::DrawArc(const TVectorPen& pen, const TDrawRect& rect, float start_angle,
                              float sweep_angle) {
    return std::isfinite(start_angle + sweep_angle) &&
           Stroke(
               ReachOf(rect), pen,
               [&](Gdiplus::GpPen* native) {
                   return Call<&TGdiPlusEntries::GdipDrawArc>(
                       native, rect.x, rect.y, rect.width, rect.height, start_angle, sweep_angle);
               },
               [&](TOutline& outline) { outline.AddArc(BoxOf(rect), start_angle, sweep_angle); });
}

bool TGdiPlusDrawing::FillPath(const TVectorBrush& brush, const TDrawPath& path) {
    return Fill(
        ReachOf(path), brush,
        [&](Gdiplus::GpBrush* native) {
            TGdiPlusPath copy;
            return MakePath(path, copy) && Call<&TGdiPlusEntries::GdipFillPath>(native, copy.Get());
        },
        [&](TOutline& outline) { outline.AddPath(path); });
}

bool TGdiPlusDrawing::FillRectangle(const TVectorBrush& brush, const TDrawRect& rect) {
    return Fill(
        ReachOf(rect), brush,
        [&](Gdiplus::GpBrush* native) {
            return Call<&TGdiPlusEntries::GdipFillRectangle>(native, rect.x, rect.y, rect.width,
                                                             rect.height);
        },
        [&](TOutline& outline) { outline.AddRectangle(BoxOf(rect)); });
}

bool TGdiPlusDrawing::FillEllipse(const TVectorBrush& brush, const TDrawRect& rect) {
    return Fill(
        ReachOf(rect), brush,
        [&](Gdiplus::GpBrush* native) {
            return Call<&TGdiPlusEntries::GdipFillEllipse>(native, rect.x, rect.y, rect.width,
                                                           rect.height);
        },
        [&](TOutline& outline) { outline.AddEllipse(BoxOf(rect)); });
}

bool TGdiPlusDrawing::FillPolygon(const TVectorBrush& brush, std::span<const TDrawPoint> points) {
    return Fill(
        ReachOf(points), brush,
        [&](Gdiplus::GpBrush* native) {
            const auto copies = NativePoints(points);
            return Call<&TGdiPlusEntries::GdipFillPolygon>(
                native, copies.data(), static_cast<INT>(copies.size()), Gdiplus::FillModeAlternate);
        },
        [&](TOutline& outline) {
            outline.AddPoints(points);
            outline.CloseFigure();
        });
}

bool TGdiPlusDrawing::FillPie(const TVectorBrush& brush, const TDrawRect& rect, float start_angle,
                              float sweep_angle) {
    return std::isfinite(start_angle + sweep_angle) &&
           Fill(
               ReachOf(rect), brush,
               [&](Gdiplus::GpBrush* native) {
                   return Call<&TGdiPlusEntries::GdipFillPie>(
                       native, rect.x, rect.y, rect.width, rect.height, start_angle, sweep_angle);
               },
               [&](TOutline& outline) { outline.AddPie(BoxOf(rect), start_angle, sweep_angle); });
}

}  // namespace zm::platform
