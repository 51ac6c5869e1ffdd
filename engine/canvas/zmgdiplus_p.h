#pragma once

#include <cstdint>
#include <vector>

#include "engine/canvas/zmgdiplus.h"

/// Geometry that the sources of the antialiasing canvas share.
namespace zm {

/// Corners in any order, right and bottom exclusive, as a position and a size. The last column and
/// row are left out: pens run through the middles of pixels, so that the outline of this rectangle
/// is the outermost ring of pixels of the given one.
platform::TDrawRect InnerRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2);

std::vector<platform::TDrawPoint> DrawPointsOf(const std::vector<TPoint>& points);
std::vector<TPoint> RoundedPoints(const TZmDPointArray& points);
platform::TDrawPoint DrawPointOf(double x, double y);

/// Size of the box around a turned box; sides are not rounded yet.
platform::TDrawSize TurnedSize(double width, double height, std::int32_t angle);

/// Angles of the library for a part of an ellipse that runs counter-clockwise between two rays:
/// the sweep is negative, and -360 when both rays are one.
struct TArcAngles {
    float start = 0;
    float sweep = 0;
};
TArcAngles AnglesBetween(const platform::TDrawRect& bounds, TPoint from, TPoint to);

}  // namespace zm
