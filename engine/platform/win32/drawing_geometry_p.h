#pragma once

#include <vector>

#include "engine/platform/drawing.h"

// Shapes that reach far beyond the target. The system's drawing works in 32-bit or narrower
// coordinates and walks every row of a shape, seen or not; such shapes become lines here and are
// cut to the neighbourhood of the target first.
namespace zm::platform {

/// Finer than the 24 bits of a float at the ends of the 32-bit range.
struct TPlanePoint {
    double x = 0;
    double y = 0;
};

struct TPlaneBox {
    double left = 0;
    double top = 0;
    double right = 0;
    double bottom = 0;

    static TPlaneBox Of(const TDrawRect& rect) {
        return {rect.x, rect.y, static_cast<double>(rect.x) + rect.width,
                static_cast<double>(rect.y) + rect.height};
    }
    bool Holds(TPlanePoint point) const {
        return point.x >= left && point.x <= right && point.y >= top && point.y <= bottom;
    }
};

/// A chain of straight lines.
struct TPlaneFigure {
    std::vector<TPlanePoint> points;
    bool is_closed = false;
};
using TPlaneFigures = std::vector<TPlaneFigure>;

/// The corners of the box, clockwise.
TPlaneFigure FigureOf(const TPlaneBox& box);

/// Appends an arc of the ellipse in `bounds` as lines that leave it by no more than a fraction of
/// a pixel when drawn `scale` times as large. Angles are those of the rays, in degrees clockwise.
void AppendArc(std::vector<TPlanePoint>& points, const TPlaneBox& bounds, double start_angle,
               double sweep_angle, double scale);

/// The angle in degrees, 0 to 360, of the ray from the middle of `bounds` through a point.
double RayAngle(const TPlaneBox& bounds, TPlanePoint through);

/// The same area as far as the box sees it.
std::vector<TPlanePoint> ClipPolygon(std::vector<TPlanePoint> points, const TPlaneBox& box);

/// The parts of the line that may be seen in the box; corners inside it stay joined.
std::vector<std::vector<TPlanePoint>> ClipPolyline(const std::vector<TPlanePoint>& points,
                                                   const TPlaneBox& box);

}  // namespace zm::platform
