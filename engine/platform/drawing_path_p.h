#pragma once

#include <optional>
#include <span>
#include <vector>

#include "engine/platform/drawing.h"

/// Geometry of the drawing in device pixels, in double precision: paths are flattened and cut to
/// the neighbourhood of what is drawn here. The libraries below count in narrower numbers, and
/// some walk every row of a shape, seen or not.
namespace zm::platform {

struct TDevicePoint {
    double x = 0;
    double y = 0;
};

/// Right and bottom exclusive; empty unless left < right and top < bottom.
struct TDeviceBox {
    double left = 0;
    double top = 0;
    double right = 0;
    double bottom = 0;
    bool IsEmpty() const { return !(left < right && top < bottom); }
    /// All four sides inclusive.
    bool Holds(const TDevicePoint& point) const {
        return point.x >= left && point.x <= right && point.y >= top && point.y <= bottom;
    }
};
TDeviceBox Intersect(const TDeviceBox& a, const TDeviceBox& b);
TDeviceBox Enlarge(const TDeviceBox& box, double margin);
TDeviceBox BoxOf(const TRect& rect);
TDeviceBox BoxOf(const TDrawRect& rect);

/// TDrawMatrix in double precision.
struct TDeviceMatrix {
    double m11 = 1;
    double m12 = 0;
    double m21 = 0;
    double m22 = 1;
    double dx = 0;
    double dy = 0;
    TDevicePoint Map(double x, double y) const {
        return {m11 * x + m21 * y + dx, m12 * x + m22 * y + dy};
    }
    /// `first` before this one.
    TDeviceMatrix After(const TDeviceMatrix& first) const;
    std::optional<TDeviceMatrix> Inverse() const;
    double Determinant() const { return m11 * m22 - m12 * m21; }
    bool IsFinite() const;
};
TDeviceBox MapBox(const TDeviceMatrix& matrix, const TDeviceBox& box);

struct TPolyline {
    std::vector<TDevicePoint> points;
    bool is_closed = false;
};

/// Figures made of straight lines.
class TOutline {
public:
    explicit TOutline(const TDeviceMatrix& matrix) : matrix_(matrix) {}

    /// For what is added from now on.
    void SetMatrix(const TDeviceMatrix& matrix) { matrix_ = matrix; }
    std::size_t PointCount() const { return point_count_; }

    void StartFigure();
    void CloseFigure();
    /// Goes on from the figure's last point, unless it is the same.
    void AddPoint(double x, double y);
    void AddPoints(std::span<const TDrawPoint> points);
    void AddRectangle(const TDeviceBox& box);
    /// Corners are quarters of an ellipse of a size, at most the box's.
    void AddRoundRect(const TDeviceBox& box, double corner_width, double corner_height);
    /// Angles are those of the rays, in degrees, clockwise; the sweep is limited to one turn.
    void AddArc(const TDeviceBox& bounds, double start_angle, double sweep_angle);
    void AddEllipse(const TDeviceBox& bounds);
    void AddPie(const TDeviceBox& bounds, double start_angle, double sweep_angle);
    void AddPath(const TDrawPath& path);

    /// Nothing when it has no point, or one that is not finite.
    std::optional<TDeviceBox> Bounds() const;
    const std::vector<TPolyline>& Figures() const { return figures_; }

private:
    TDeviceMatrix matrix_;
    std::vector<TPolyline> figures_;
    std::size_t point_count_ = 0;
    bool is_open_ = false;
};

/// Angles of the part of an ellipse from the ray through one point counter-clockwise to that
/// through another, in degrees; the same ray twice means all of it.
struct TSweep {
    double start = 0;
    double sweep = 0;
};
TSweep SweepBetween(const TDeviceBox& bounds, TDevicePoint start, TDevicePoint end);

/// The figures as closed polygons, cut at the box.
std::vector<TPolyline> CutPolygons(const std::vector<TPolyline>& figures, const TDeviceBox& box);
/// The figures as lines, without what lies outside the box. Figures that lie within stay whole.
std::vector<TPolyline> CutLines(const std::vector<TPolyline>& figures, const TDeviceBox& box);

}  // namespace zm::platform
