#include "engine/platform/drawing_path_p.h"

#include <algorithm>
#include <cmath>
#include <numbers>

#include "engine/foundation/zmnumbers.h"

namespace zm::platform {
namespace {

constexpr double kRadiansPerDegree = std::numbers::pi / 180;
constexpr double kWholeTurn = 2 * std::numbers::pi;

/// How far a chord may lie from its arc, in pixels, and how many chords there are at most.
constexpr double kFlatness = 0.02;
constexpr double kMostChords = 100000;

/// The ellipse's own parameter on the ray of an angle, of the same turn.
double ParameterOf(double angle, double radius_x, double radius_y) {
    const double parameter = std::atan2(radius_x * std::sin(angle), radius_y * std::cos(angle));
    return parameter + kWholeTurn * std::nearbyint((angle - parameter) / kWholeTurn);
}

/// Chords for a sweep of an arc whose larger radius is given.
std::int32_t ChordCount(double radius, double sweep) {
    const double step = radius > kFlatness ? 2 * std::acos(1 - kFlatness / radius) : 1;
    const double count = std::ceil(std::abs(sweep) / std::max(step, 1e-9));
    return TruncToInt(std::clamp(count, 4.0, kMostChords));
}

bool IsInside(const TPolyline& figure, const TDeviceBox& box) {
    return std::all_of(figure.points.begin(), figure.points.end(),
                       [&](const TDevicePoint& point) { return box.Holds(point); });
}

/// Keeps what lies on the inner side of one edge, `distance` telling how far inside a point is.
template <typename TDistance>
std::vector<TDevicePoint> CutAtEdge(const std::vector<TDevicePoint>& points, TDistance distance) {
    std::vector<TDevicePoint> result;
    for (std::size_t i = 0; i < points.size(); ++i) {
        const TDevicePoint& from = points[i];
        const TDevicePoint& to = points[(i + 1) % points.size()];
        const double from_depth = distance(from);
        const double to_depth = distance(to);
        if (from_depth >= 0) {
            result.push_back(from);
        }
        if ((from_depth >= 0) != (to_depth >= 0)) {
            const double share = from_depth / (from_depth - to_depth);
            result.push_back({from.x + (to.x - from.x) * share, from.y + (to.y - from.y) * share});
        }
    }
    return result;
}

/// The part of a segment within a box, as shares of its length; nothing when it misses the box.
std::optional<std::pair<double, double>> InnerShares(const TDevicePoint& from,
                                                     const TDevicePoint& to,
                                                     const TDeviceBox& box) {
    double first = 0;
    double last = 1;
    const auto cut = [&](double start, double delta, double low, double high) {
        if (delta == 0) {
            return start >= low && start <= high;
        }
        const double at_low = (low - start) / delta;
        const double at_high = (high - start) / delta;
        first = std::max(first, std::min(at_low, at_high));
        last = std::min(last, std::max(at_low, at_high));
        return first <= last;
    };
    if (!cut(from.x, to.x - from.x, box.left, box.right) ||
        !cut(from.y, to.y - from.y, box.top, box.bottom)) {
        return std::nullopt;
    }
    return std::pair(first, last);
}

}  // namespace

// Boxes and matrices.

TDeviceBox Intersect(const TDeviceBox& a, const TDeviceBox& b) {
    return {std::max(a.left, b.left), std::max(a.top, b.top), std::min(a.right, b.right),
            std::min(a.bottom, b.bottom)};
}

TDeviceBox Enlarge(const TDeviceBox& box, double margin) {
    return {box.left - margin, box.top - margin, box.right + margin, box.bottom + margin};
}

TDeviceBox BoxOf(const TRect& rect) {
    return {static_cast<double>(rect.left), static_cast<double>(rect.top),
            static_cast<double>(rect.right), static_cast<double>(rect.bottom)};
}

TDeviceBox BoxOf(const TDrawRect& rect) {
    return {rect.x, rect.y, double{rect.x} + rect.width, double{rect.y} + rect.height};
}

TDeviceMatrix TDeviceMatrix::After(const TDeviceMatrix& first) const {
    const TDevicePoint origin = Map(first.dx, first.dy);
    return {m11 * first.m11 + m21 * first.m12,
            m12 * first.m11 + m22 * first.m12,
            m11 * first.m21 + m21 * first.m22,
            m12 * first.m21 + m22 * first.m22,
            origin.x,
            origin.y};
}

std::optional<TDeviceMatrix> TDeviceMatrix::Inverse() const {
    const double determinant = Determinant();
    if (!IsFinite() || determinant == 0 || !std::isfinite(1 / determinant)) {
        return std::nullopt;
    }
    TDeviceMatrix inverse{
        m22 / determinant, -m12 / determinant, -m21 / determinant, m11 / determinant, 0, 0};
    const TDevicePoint origin = inverse.Map(dx, dy);
    inverse.dx = -origin.x;
    inverse.dy = -origin.y;
    return inverse;
}

bool TDeviceMatrix::IsFinite() const {
    return std::isfinite(m11) && std::isfinite(m12) && std::isfinite(m21) && std::isfinite(m22) &&
           std::isfinite(dx) && std::isfinite(dy);
}

TDeviceBox MapBox(const TDeviceMatrix& matrix, const TDeviceBox& box) {
    const TDevicePoint corners[] = {matrix.Map(box.left, box.top), matrix.Map(box.right, box.top),
                                    matrix.Map(box.right, box.bottom),
                                    matrix.Map(box.left, box.bottom)};
    TDeviceBox result{corners[0].x, corners[0].y, corners[0].x, corners[0].y};
    for (const TDevicePoint& corner : corners) {
        result = {std::min(result.left, corner.x), std::min(result.top, corner.y),
                  std::max(result.right, corner.x), std::max(result.bottom, corner.y)};
    }
    return result;
}

// Building.

void TOutline::StartFigure() {
    is_open_ = false;
}

void TOutline::CloseFigure() {
    if (is_open_) {
        figures_.back().is_closed = true;
    }
    is_open_ = false;
}

void TOutline::AddPoint(double x, double y) {
    const TDevicePoint point = matrix_.Map(x, y);
    if (!is_open_) {
        figures_.emplace_back();
        is_open_ = true;
    }
    std::vector<TDevicePoint>& points = figures_.back().points;
    if (points.empty() || points.back().x != point.x || points.back().y != point.y) {
        points.push_back(point);
        ++point_count_;
    }
}

void TOutline::AddPoints(std::span<const TDrawPoint> points) {
    for (const TDrawPoint& point : points) {
        AddPoint(point.x, point.y);
    }
}

void TOutline::AddRectangle(const TDeviceBox& box) {
    StartFigure();
    AddPoint(box.left, box.top);
    AddPoint(box.right, box.top);
    AddPoint(box.right, box.bottom);
    AddPoint(box.left, box.bottom);
    CloseFigure();
}

void TOutline::AddRoundRect(const TDeviceBox& box, double corner_width, double corner_height) {
    const double width = std::clamp(corner_width, 0.0, std::max(box.right - box.left, 0.0));
    const double height = std::clamp(corner_height, 0.0, std::max(box.bottom - box.top, 0.0));
    if (!(width > 0 && height > 0)) {
        AddRectangle(box);
        return;
    }
    const double right = box.right - width;
    const double bottom = box.bottom - height;
    StartFigure();
    AddArc({box.left, box.top, box.left + width, box.top + height}, 180, 90);
    AddArc({right, box.top, box.right, box.top + height}, 270, 90);
    AddArc({right, bottom, box.right, box.bottom}, 0, 90);
    AddArc({box.left, bottom, box.left + width, box.bottom}, 90, 90);
    CloseFigure();
}

void TOutline::AddArc(const TDeviceBox& bounds, double start_angle, double sweep_angle) {
    const double radius_x = (bounds.right - bounds.left) / 2;
    const double radius_y = (bounds.bottom - bounds.top) / 2;
    const double center_x = bounds.left + radius_x;
    const double center_y = bounds.top + radius_y;
    const double start = std::fmod(start_angle, 360.0) * kRadiansPerDegree;
    const double sweep = std::clamp(sweep_angle, -360.0, 360.0) * kRadiansPerDegree;
    const double first = ParameterOf(start, radius_x, radius_y);
    const double last = ParameterOf(start + sweep, radius_x, radius_y);
    const double scale =
        std::max(std::hypot(matrix_.m11, matrix_.m12), std::hypot(matrix_.m21, matrix_.m22));
    const std::int32_t chords =
        ChordCount(std::max(std::abs(radius_x), std::abs(radius_y)) * scale, last - first);
    for (std::int32_t i = 0; i <= chords; ++i) {
        const double parameter = first + (last - first) * i / chords;
        AddPoint(center_x + radius_x * std::cos(parameter),
                 center_y + radius_y * std::sin(parameter));
    }
}

void TOutline::AddEllipse(const TDeviceBox& bounds) {
    StartFigure();
    AddArc(bounds, 0, 360);
    CloseFigure();
}

void TOutline::AddPie(const TDeviceBox& bounds, double start_angle, double sweep_angle) {
    StartFigure();
    AddPoint((bounds.left + bounds.right) / 2, (bounds.top + bounds.bottom) / 2);
    AddArc(bounds, start_angle, sweep_angle);
    CloseFigure();
}

TSweep SweepBetween(const TDeviceBox& bounds, TDevicePoint start, TDevicePoint end) {
    const double x = (bounds.left + bounds.right) / 2;
    const double y = (bounds.top + bounds.bottom) / 2;
    const double first = std::atan2(start.y - y, start.x - x) / kRadiansPerDegree;
    const double last = std::atan2(end.y - y, end.x - x) / kRadiansPerDegree;
    return {first, last - first >= 0 ? last - first - 360 : last - first};
}

void TOutline::AddPath(const TDrawPath& path) {
    for (const TDrawPathPart& part : path) {
        switch (part.kind) {
            case pkLine:
                AddPoint(part.from.x, part.from.y);
                AddPoint(part.to.x, part.to.y);
                break;
            case pkArc: AddArc(BoxOf(part.bounds), part.start_angle, part.sweep_angle); break;
            case pkStartFigure: StartFigure(); break;
            case pkCloseFigure: CloseFigure(); break;
        }
    }
}

std::optional<TDeviceBox> TOutline::Bounds() const {
    std::optional<TDeviceBox> bounds;
    for (const TPolyline& figure : figures_) {
        for (const TDevicePoint& point : figure.points) {
            if (!std::isfinite(point.x) || !std::isfinite(point.y)) {
                return std::nullopt;
            }
            const TDeviceBox box = bounds.value_or(TDeviceBox{point.x, point.y, point.x, point.y});
            bounds = {std::min(box.left, point.x), std::min(box.top, point.y),
                      std::max(box.right, point.x), std::max(box.bottom, point.y)};
        }
    }
    return bounds;
}

// Cutting.

std::vector<TPolyline> CutPolygons(const std::vector<TPolyline>& figures, const TDeviceBox& box) {
    std::vector<TPolyline> result;
    for (const TPolyline& figure : figures) {
        TPolyline part{figure.points, /*is_closed=*/true};
        if (!IsInside(figure, box)) {
            auto& points = part.points;
            points = CutAtEdge(points, [&](const auto& p) { return p.x - box.left; });
            points = CutAtEdge(points, [&](const auto& p) { return box.right - p.x; });
            points = CutAtEdge(points, [&](const auto& p) { return p.y - box.top; });
            points = CutAtEdge(points, [&](const auto& p) { return box.bottom - p.y; });
        }
        if (!part.points.empty()) {
            result.push_back(std::move(part));
        }
    }
    return result;
}

std::vector<TPolyline> CutLines(const std::vector<TPolyline>& figures, const TDeviceBox& box) {
    std::vector<TPolyline> result;
    for (const TPolyline& figure : figures) {
        if (IsInside(figure, box)) {
            result.push_back(figure);
            continue;
        }
        const std::size_t count = figure.points.size();
        const std::size_t segments = figure.is_closed ? count : count - 1;
        bool is_joined = false;  // the last part ends where the next segment begins
        for (std::size_t i = 0; i < segments; ++i) {
            const TDevicePoint from = figure.points[i];
            const TDevicePoint to = figure.points[(i + 1) % count];
            const auto shares = InnerShares(from, to, box);
            if (!shares) {
                is_joined = false;
                continue;
            }
            const auto at = [&](double share) {
                return TDevicePoint{from.x + (to.x - from.x) * share,
                                    from.y + (to.y - from.y) * share};
            };
            if (!is_joined || shares->first > 0) {
                result.push_back({{at(shares->first)}, /*is_closed=*/false});
            }
            result.back().points.push_back(at(shares->second));
            is_joined = shares->second >= 1;
        }
    }
    return result;
}

}  // namespace zm::platform
