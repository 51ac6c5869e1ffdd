/// Lines and shapes.

#include <algorithm>
#include <cmath>
#include <numbers>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/canvas/zmgdiplus.h"
#include "engine/canvas/zmgdiplus_p.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

using platform::TDrawPath;
using platform::TDrawPathPart;
using platform::TDrawPoint;
using platform::TDrawRect;

constexpr double kDegreesPerRadian = 180 / std::numbers::pi;
constexpr float kWholeTurn = 360;

TDrawPathPart LinePart(TDrawPoint from, TDrawPoint to) {
    return {platform::pkLine, from, to, {}, 0, 0};
}

TDrawPathPart ArcPart(const TDrawRect& bounds, float start_angle, float sweep_angle) {
    return {platform::pkArc, {}, {}, bounds, start_angle, sweep_angle};
}

/// Angle of the ray to a point in degrees, clockwise from the right.
double RayAngle(double dx, double dy) {
    return std::atan2(dy, dx) * kDegreesPerRadian;
}

TRect SortedRect(const TRect& rect) {
    return TRect{std::min(rect.left, rect.right), std::min(rect.top, rect.bottom),
                 std::max(rect.left, rect.right), std::max(rect.top, rect.bottom)};
}

/// Four arcs and the lines between them, clockwise from the top left corner.
TDrawPath RoundRectPath(const TDrawRect& rect, float corner_width, float corner_height) {
    const float width = std::clamp(corner_width, 0.0F, rect.width);
    const float height = std::clamp(corner_height, 0.0F, rect.height);
    const float right = rect.x + rect.width;
    const float bottom = rect.y + rect.height;
    const float half_width = width / 2;
    const float half_height = height / 2;
    constexpr float kQuarter = 90;
    TDrawPath path;
    const auto add_arc = [&](float x, float y, float start) {
        if (width > 0 && height > 0) {
            path.push_back(ArcPart({x, y, width, height}, start, kQuarter));
        }
    };
    add_arc(rect.x, rect.y, 2 * kQuarter);
    path.push_back(LinePart({rect.x + half_width, rect.y}, {right - half_width, rect.y}));
    add_arc(right - width, rect.y, 3 * kQuarter);
    path.push_back(LinePart({right, rect.y + half_height}, {right, bottom - half_height}));
    add_arc(right - width, bottom - height, 0);
    path.push_back(LinePart({right - half_width, bottom}, {rect.x + half_width, bottom}));
    add_arc(rect.x, bottom - height, kQuarter);
    path.push_back(LinePart({rect.x, bottom - half_height}, {rect.x, rect.y + half_height}));
    path.push_back({platform::pkCloseFigure, {}, {}, {}, 0, 0});
    return path;
}

}  // namespace

// Geometry.

TDrawRect InnerRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2) {
    const std::int64_t width = std::abs(std::int64_t{x2} - x1) - 1;
    const std::int64_t height = std::abs(std::int64_t{y2} - y1) - 1;
    return {static_cast<float>(std::min(x1, x2)), static_cast<float>(std::min(y1, y2)),
            static_cast<float>(width), static_cast<float>(height)};
}

TDrawPoint DrawPointOf(double x, double y) {
    return {static_cast<float>(x), static_cast<float>(y)};
}

std::vector<TDrawPoint> DrawPointsOf(const std::vector<TPoint>& points) {
    std::vector<TDrawPoint> result;
    result.reserve(points.size());
    for (const TPoint& point : points) {
        result.push_back(DrawPointOf(point.x, point.y));
    }
    return result;
}

std::vector<TPoint> RoundedPoints(const TZmDPointArray& points) {
    std::vector<TPoint> result;
    result.reserve(points.size());
    for (const TZmDPoint& point : points) {
        result.push_back({RoundHalfEven(point.X), RoundHalfEven(point.Y)});
    }
    return result;
}

TArcAngles AnglesBetween(const TDrawRect& bounds, TPoint from, TPoint to) {
    const double center_x = bounds.x + bounds.width / 2.0;
    const double center_y = bounds.y + bounds.height / 2.0;
    const double start = RayAngle(from.x - center_x, from.y - center_y);
    double sweep = RayAngle(to.x - center_x, to.y - center_y) - start;
    if (sweep >= 0) {
        sweep -= kWholeTurn;
    }
    return {static_cast<float>(start), static_cast<float>(sweep)};
}

const platform::TVectorPen* TZmCanvas::VisiblePen() const {
    return fPen->GetStyle() == psClear ? nullptr : fPen->GetGHandle();
}

// Lines.

void TZmCanvas::MoveTo(std::int32_t X, std::int32_t Y) {
    fPenPos = {X, Y};
    if (!fUseGDIPlus) {
        fCanvas.MoveTo(X, Y);
    }
}

void TZmCanvas::LineTo(std::int32_t X, std::int32_t Y) {
    if (!fUseGDIPlus) {
        fCanvas.LineTo(X, Y);
    } else if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawLine(*pen, DrawPointOf(fPenPos.x, fPenPos.y), DrawPointOf(X, Y));
    }
    fPenPos = {X, Y};
}

void TZmCanvas::DrawLine(double X1, double Y1, double X2, double Y2) {
    if (!fUseGDIPlus) {
        fCanvas.MoveTo(RoundHalfEven(X1), RoundHalfEven(Y1));
        fCanvas.LineTo(RoundHalfEven(X2), RoundHalfEven(Y2));
    } else if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawLine(*pen, DrawPointOf(X1, Y1), DrawPointOf(X2, Y2));
    }
}

void TZmCanvas::DrawCurvedLine(double X1, double Y1, double X2, double Y2, double CenterX,
                               double CenterY) {
    const double radius = std::hypot(X1 - CenterX, Y1 - CenterY);
    const double start = RayAngle(X1 - CenterX, Y1 - CenterY);
    double sweep = RayAngle(X2 - CenterX, Y2 - CenterY) - start;
    if (sweep > kWholeTurn / 2) {
        sweep -= kWholeTurn;
    } else if (sweep <= -kWholeTurn / 2) {
        sweep += kWholeTurn;
    }
    if (!fUseGDIPlus || !(radius > 0) || sweep == 0) {
        DrawLine(X1, Y1, X2, Y2);
    } else if (const auto* const pen = VisiblePen()) {
        const TDrawPoint end = DrawPointOf(X2, Y2);
        const TDrawPoint corner = DrawPointOf(CenterX - radius, CenterY - radius);
        const auto side = static_cast<float>(2 * radius);
        TDrawPath path = {ArcPart({corner.x, corner.y, side, side}, static_cast<float>(start),
                                  static_cast<float>(sweep))};
        if (std::hypot(X2 - CenterX, Y2 - CenterY) != radius) {
            path.push_back(LinePart(end, end));
        }
        fGraphics->DrawPath(*pen, path);
    }
}

void TZmCanvas::DrawLinesPath(const TZmDPointArray& Points) {
    if (!fUseGDIPlus) {
        fCanvas.Polyline(RoundedPoints(Points));
        return;
    }
    TDrawPath path;
    for (std::size_t i = 1; i < Points.size(); ++i) {
        path.push_back(LinePart(DrawPointOf(Points[i - 1].X, Points[i - 1].Y),
                                DrawPointOf(Points[i].X, Points[i].Y)));
    }
    if (const auto* const pen = VisiblePen(); pen != nullptr && !path.empty()) {
        fGraphics->DrawPath(*pen, path);
    }
}

void TZmCanvas::Polyline(const std::vector<TPoint>& Points) {
    if (!fUseGDIPlus) {
        fCanvas.Polyline(Points);
    } else if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawLines(*pen, DrawPointsOf(Points));
    }
}

// Required: whole coordinates here and in PolygonD, though DrawLinesPath keeps fractions.
void TZmCanvas::PolylineD(const TZmDPointArray& Points) {
    Polyline(RoundedPoints(Points));
}

void TZmCanvas::Arc(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2,
                    std::int32_t X3, std::int32_t Y3, std::int32_t X4, std::int32_t Y4) {
    if (!fUseGDIPlus) {
        fCanvas.Arc(TRect{X1, Y1, X2, Y2}, TPoint{X3, Y3}, TPoint{X4, Y4});
    } else if (const auto* const pen = VisiblePen()) {
        const TDrawRect bounds = InnerRect(X1, Y1, X2, Y2);
        const auto [start, sweep] = AnglesBetween(bounds, TPoint{X3, Y3}, TPoint{X4, Y4});
        fGraphics->DrawArc(*pen, bounds, start, sweep);
    }
}

// Shapes.

void TZmCanvas::FillRect(const TRect& Rect) {
    if (!fUseGDIPlus) {
        fCanvas.FillRect(Rect);
        return;
    }
    // Required: the last column and row stay free, as callers that add an outline expect.
    fGraphics->FillRectangle(*fBrush->GetGHandle(),
                             InnerRect(Rect.left, Rect.top, Rect.right, Rect.bottom));
}

void TZmCanvas::Rectangle(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2) {
    if (!fUseGDIPlus) {
        fCanvas.Rectangle(TRect{X1, Y1, X2, Y2});
        return;
    }
    const TDrawRect rect = InnerRect(X1, Y1, X2, Y2);
    fGraphics->FillRectangle(*fBrush->GetGHandle(), rect);
    if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawRectangle(*pen, rect);
    }
}

void TZmCanvas::Ellipse(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2) {
    if (!fUseGDIPlus) {
        fCanvas.Ellipse(TRect{X1, Y1, X2, Y2});
        return;
    }
    const TDrawRect bounds = InnerRect(X1, Y1, X2, Y2);
    fGraphics->FillEllipse(*fBrush->GetGHandle(), bounds);
    if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawEllipse(*pen, bounds);
    }
}

void TZmCanvas::FillAndDraw(const TDrawPath& path) {
    fGraphics->FillPath(*fBrush->GetGHandle(), path);
    if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawPath(*pen, path);
    }
}

void TZmCanvas::RoundRect(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2,
                          std::int32_t X3, std::int32_t Y3) {
    if (!fUseGDIPlus) {
        fCanvas.RoundRect(TRect{X1, Y1, X2, Y2}, X3, Y3);
        return;
    }
    const TDrawRect rect = InnerRect(X1, Y1, X2, Y2);
    if (rect.width > 0 && rect.height > 0) {
        FillAndDraw(RoundRectPath(rect, static_cast<float>(X3), static_cast<float>(Y3)));
    }
}

void TZmCanvas::Polygon(const std::vector<TPoint>& Points) {
    if (!fUseGDIPlus) {
        fCanvas.Polygon(Points);
        return;
    }
    const auto points = DrawPointsOf(Points);
    fGraphics->FillPolygon(*fBrush->GetGHandle(), points);
    if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawPolygon(*pen, points);
    }
}

void TZmCanvas::PolygonD(const TZmDPointArray& Points) {
    Polygon(RoundedPoints(Points));
}

void TZmCanvas::FillAndDrawPie(const TDrawRect& bounds, float start_angle, float sweep_angle) {
    fGraphics->FillPie(*fBrush->GetGHandle(), bounds, start_angle, sweep_angle);
    if (const auto* const pen = VisiblePen()) {
        fGraphics->DrawPie(*pen, bounds, start_angle, sweep_angle);
    }
}

void TZmCanvas::Pie(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2,
                    std::int32_t X3, std::int32_t Y3, std::int32_t X4, std::int32_t Y4) {
    if (!fUseGDIPlus) {
        fCanvas.Pie(TRect{X1, Y1, X2, Y2}, TPoint{X3, Y3}, TPoint{X4, Y4});
        return;
    }
    const TDrawRect bounds = InnerRect(X1, Y1, X2, Y2);
    const auto [start, sweep] = AnglesBetween(bounds, TPoint{X3, Y3}, TPoint{X4, Y4});
    FillAndDrawPie(bounds, start, sweep);
}

void TZmCanvas::Pie(std::int32_t X1, std::int32_t Y1, std::int32_t X2, std::int32_t Y2,
                    float StartAngle, float SweepAngle) {
    const TDrawRect bounds = InnerRect(X1, Y1, X2, Y2);
    if (fUseGDIPlus) {
        FillAndDrawPie(bounds, StartAngle, SweepAngle);
        return;
    }
    // The platform goes counter-clockwise between rays: far points on them, in that order.
    constexpr double kRayLength = 1 << 20;
    const auto ray_end = [&](double angle) {
        const double radians = angle / kDegreesPerRadian;
        return TPoint{
            RoundHalfEven(bounds.x + bounds.width / 2.0 + kRayLength * std::cos(radians)),
            RoundHalfEven(bounds.y + bounds.height / 2.0 + kRayLength * std::sin(radians))};
    };
    const TPoint first = ray_end(StartAngle);
    const TPoint last = ray_end(double{StartAngle} + SweepAngle);
    const TRect rect{X1, Y1, X2, Y2};
    if (SweepAngle < 0) {
        fCanvas.Pie(rect, first, last);
    } else if (SweepAngle > 0) {
        fCanvas.Pie(rect, last, first);
    }
}

// Gradients.

void TZmCanvas::GradientFillRect(const TRect& Rect, TZmGDIPlusGradient Dir) {
    GradientFillRect(Rect, fBrush->GetColor(), fBrush->GetBackColor(), Dir);
}

void TZmCanvas::GradientFillRect(const TRect& Rect, TColor FromColor, TColor ToColor,
                                 TZmGDIPlusGradient Dir) {
    if (!fUseGDIPlus) {
        return;
    }
    const TRect rect = SortedRect(Rect);
    TZmBrush gradient(/*Brush=*/nullptr);
    gradient.SetTransparency(fBrush->GetTransparency());
    gradient.SetBackTransparency(fBrush->GetBackTransparency());
    gradient.SetStyle(fBrush->GetStyle());  // counts where the direction gives no gradient
    gradient.SetColor(FromColor);
    gradient.SetBackColor(ToColor);
    gradient.SetGradient(Dir, SaturateToInt32(std::int64_t{rect.right} - rect.left),
                         SaturateToInt32(std::int64_t{rect.bottom} - rect.top));
    gradient.RebuildAt(static_cast<float>(rect.left), static_cast<float>(rect.top));
    std::swap(gradient.fGHandle, fBrush->fGHandle);
    FillRect(rect);
    std::swap(gradient.fGHandle, fBrush->fGHandle);
}

void TZmCanvas::Draw(const TZmMetafile& Metafile, std::int32_t X, std::int32_t Y,
                     std::int32_t Width, std::int32_t Height) {
    if (fUseGDIPlus && Metafile.GetHandle() != nullptr) {
        fGraphics->DrawMetafile(*Metafile.GetHandle(),
                                {static_cast<float>(X), static_cast<float>(Y),
                                 static_cast<float>(Width), static_cast<float>(Height)});
    }
}

}  // namespace zm
