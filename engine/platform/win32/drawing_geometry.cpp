#include "engine/platform/win32/drawing_geometry_p.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <numbers>
#include <optional>

#include "engine/foundation/zmnumbers.h"

namespace zm::platform {
namespace {

constexpr double kDegree = std::numbers::pi / 180.0;
/// How far a chord may leave its arc, in pixels.
constexpr double kFlatness = 0.1;
constexpr double kMinArcLines = 16;
/// Enough for a radius at the end of the 32-bit range.
constexpr double kMaxArcLines = 1 << 20;

/// Lines for a whole ellipse: a chord over the angle a leaves its circle by r (1 - cos(a / 2)).
double LinesOfCircle(double radius) {
    if (!(radius > kFlatness)) {
        return kMinArcLines;
    }
    const double half_angle = std::acos(1.0 - kFlatness / radius);
    return std::clamp(std::numbers::pi / half_angle, kMinArcLines, kMaxArcLines);
}

/// The parameter of the ellipse's point on a ray. Full turns stay, so that sweeps keep their
/// size and sign.
double ParameterOfRay(double angle, double radius_x, double radius_y) {
    const double turns = std::floor(angle / 360.0);
    const double ray = (angle - turns * 360.0) * kDegree;
    double parameter = std::atan2(radius_x * std::sin(ray), radius_y * std::cos(ray));
    if (parameter < 0) {
        parameter += 2 * std::numbers::pi;
    }
    return parameter + turns * 2 * std::numbers::pi;
}

/// One of the box's four sides: the half plane where a x + b y <= c.
struct TSide {
    double a;
    double b;
    double c;

    double Excess(TPlanePoint point) const { return a * point.x + b * point.y - c; }
};

std::array<TSide, 4> SidesOf(const TPlaneBox& box) {
    return {TSide{-1, 0, -box.left}, TSide{0, -1, -box.top}, TSide{1, 0, box.right},
            TSide{0, 1, box.bottom}};
}

TPlanePoint PointBetween(TPlanePoint from, TPlanePoint to, double part) {
    return {from.x + (to.x - from.x) * part, from.y + (to.y - from.y) * part};
}

std::vector<TPlanePoint> ClipPolygonAtSide(const std::vector<TPlanePoint>& points,
                                           const TSide& side) {
    std::vector<TPlanePoint> kept;
    kept.reserve(points.size() + 4);
    for (std::size_t index = 0; index < points.size(); ++index) {
        const TPlanePoint from = points[index == 0 ? points.size() - 1 : index - 1];
        const TPlanePoint to = points[index];
        const double from_excess = side.Excess(from);
        const double to_excess = side.Excess(to);
        if ((from_excess > 0) != (to_excess > 0)) {
            kept.push_back(PointBetween(from, to, from_excess / (from_excess - to_excess)));
        }
        if (to_excess <= 0) {
            kept.push_back(to);
        }
    }
    return kept;
}

struct TSegment {
    TPlanePoint from;
    TPlanePoint to;
};

/// The part of a segment in the box, if any.
std::optional<TSegment> ClipSegment(const TSegment& segment, const TPlaneBox& box) {
    double first = 0;
    double last = 1;
    for (const TSide& side : SidesOf(box)) {
        const double from_excess = side.Excess(segment.from);
        const double to_excess = side.Excess(segment.to);
        if (from_excess > 0 && to_excess > 0) {
            return std::nullopt;
        }
        if (from_excess > 0) {
            first = std::max(first, from_excess / (from_excess - to_excess));
        } else if (to_excess > 0) {
            last = std::min(last, from_excess / (from_excess - to_excess));
        }
    }
    if (first > last) {
        return std::nullopt;
    }
    return TSegment{first == 0 ? segment.from : PointBetween(segment.from, segment.to, first),
                    last == 1 ? segment.to : PointBetween(segment.from, segment.to, last)};
}

}  // namespace

TPlaneFigure FigureOf(const TPlaneBox& box) {
    return {{{box.left, box.top},
             {box.right, box.top},
             {box.right, box.bottom},
             {box.left, box.bottom}},
            true};
}

void AppendArc(std::vector<TPlanePoint>& points, const TPlaneBox& bounds, double start_angle,
               double sweep_angle, double scale) {
    const double radius_x = (bounds.right - bounds.left) / 2;
    const double radius_y = (bounds.bottom - bounds.top) / 2;
    const double center_x = bounds.left + radius_x;
    const double center_y = bounds.top + radius_y;
    const double sweep = std::clamp(sweep_angle, -360.0, 360.0);
    const double start = std::fmod(start_angle, 360.0);
    const double first = ParameterOfRay(start, radius_x, radius_y);
    const double last = ParameterOfRay(start + sweep, radius_x, radius_y);
    const double radius = std::max(std::abs(radius_x), std::abs(radius_y)) * std::abs(scale);
    const double share = std::abs(last - first) / (2 * std::numbers::pi);
    const int lines = TruncToInt(std::ceil(LinesOfCircle(radius) * share)) + 1;
    for (int line = 0; line <= lines; ++line) {
        const double parameter = first + (last - first) * line / lines;
        points.push_back(
            {center_x + radius_x * std::cos(parameter), center_y + radius_y * std::sin(parameter)});
    }
}

double RayAngle(const TPlaneBox& bounds, TPlanePoint through) {
    const double x = through.x - (bounds.left + bounds.right) / 2;
    const double y = through.y - (bounds.top + bounds.bottom) / 2;
    const double angle = std::atan2(y, x) / kDegree;
    return angle < 0 ? angle + 360.0 : angle;
}

std::vector<TPlanePoint> ClipPolygon(std::vector<TPlanePoint> points, const TPlaneBox& box) {
    for (const TSide& side : SidesOf(box)) {
        points = ClipPolygonAtSide(points, side);
    }
    return points;
}

std::vector<std::vector<TPlanePoint>> ClipPolyline(const std::vector<TPlanePoint>& points,
                                                   const TPlaneBox& box) {
    std::vector<std::vector<TPlanePoint>> runs;
    bool continues = false;
    for (std::size_t index = 1; index < points.size(); ++index) {
        const auto part = ClipSegment({points[index - 1], points[index]}, box);
        if (!part) {
            continues = false;
            continue;
        }
        if (!continues) {
            runs.push_back({part->from});
        }
        runs.back().push_back(part->to);
        continues = box.Holds(points[index]);
    }
    return runs;
}

}  // namespace zm::platform
