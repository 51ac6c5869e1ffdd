#include "engine/platform/win32/drawing_plain_p.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <new>
#include <stdexcept>

#include "engine/foundation/zmnumbers.h"

// The shapes of the plain drawing; its text stands in drawing_plaintext.cpp.
namespace zm::platform {
namespace {

/// How far beyond the target a coordinate may lie for the system to see it: it walks every row of
/// a shape, seen or not.
constexpr double kNearReach = 32768;
constexpr double kFillMargin = 64;
/// A wider pen covers any target all the same.
constexpr std::int32_t kMaxPenWidth = 1 << 17;
constexpr double kPenWidthsSeen = 6;
constexpr std::uint8_t kNoBrush = 1;
constexpr std::uint8_t kFirstHatch = 2;
constexpr std::uint8_t kLastHatch = 7;
constexpr TPlainPen kNoPen{.style = PS_NULL};
constexpr TPlainBrush kEmptyBrush{.style = kNoBrush};

/// The system's raster operations in the order of the pen's modes.
constexpr std::array kRasterOperations = {
    R2_BLACK,       R2_WHITE,      R2_NOP,         R2_NOT,        R2_COPYPEN,  R2_NOTCOPYPEN,
    R2_MERGEPENNOT, R2_MASKPENNOT, R2_MERGENOTPEN, R2_MASKNOTPEN, R2_MERGEPEN, R2_NOTMERGEPEN,
    R2_MASKPEN,     R2_NOTMASKPEN, R2_XORPEN,      R2_NOTXORPEN};

COLORREF NativeColor(TColor color) {
    const TRGB channels = RGBFromColor(color);
    return RGB(channels.r, channels.g, channels.b);
}

HPEN MakePen(const TPlainPen& pen) {
    const int style = pen.style <= PS_INSIDEFRAME ? pen.style : PS_SOLID;
    return ::CreatePen(style, std::clamp(pen.width, 0, kMaxPenWidth), NativeColor(pen.color));
}

HBRUSH MakeBrush(const TPlainBrush& brush) {
    if (brush.style == kNoBrush) {
        const LOGBRUSH hollow{BS_NULL, 0, 0};
        return ::CreateBrushIndirect(&hollow);
    }
    if (brush.style >= kFirstHatch && brush.style <= kLastHatch) {
        return ::CreateHatchBrush(brush.style - kFirstHatch, NativeColor(brush.color));
    }
    return ::CreateSolidBrush(NativeColor(brush.color));
}

/// Pen and brush for one shape. The lines of a hatch leave what lies between them.
class TShapeScope {
public:
    TShapeScope(HDC context, const TPlainPen& pen, const TPlainBrush& brush)
        : context_(context),
          pen_(context, MakePen(pen)),
          brush_(context, MakeBrush(brush)),
          mode_(::SetROP2(context, pen.mode < kRasterOperations.size() ? kRasterOperations[pen.mode]
                                                                       : R2_COPYPEN)),
          background_(::SetBkMode(context, TRANSPARENT)) {}
    ~TShapeScope() {
        ::SetBkMode(context_, background_);
        ::SetROP2(context_, mode_);
    }
    TShapeScope(const TShapeScope&) = delete;
    TShapeScope& operator=(const TShapeScope&) = delete;
    bool IsReady() const { return pen_.IsSelected() && brush_.IsSelected(); }

private:
    HDC context_;
    TSelectedObject pen_;
    TSelectedObject brush_;
    int mode_;
    int background_;
};

std::vector<POINT> NativePoints(std::span<const TPoint> points) {
    std::vector<POINT> native;
    native.reserve(points.size());
    for (const TPoint& point : points) {
        native.push_back({point.x, point.y});
    }
    return native;
}

std::vector<POINT> NativePoints(const std::vector<TDevicePoint>& points) {
    std::vector<POINT> native;
    native.reserve(points.size());
    for (const TDevicePoint& point : points) {
        native.push_back({RoundHalfEven(point.x), RoundHalfEven(point.y)});
    }
    return native;
}

/// The shape as lines, in the coordinates of the calls.
template <typename TAdd>
TOutline MakeOutline(const TAdd& add) {
    TOutline outline({});
    add(outline);
    return outline;
}

TOutline LinesThrough(std::span<const TPoint> points) {
    return MakeOutline([&](TOutline& outline) {
        for (const TPoint& point : points) {
            outline.AddPoint(point.x, point.y);
        }
    });
}

/// Pixels that an outline within the rectangle runs through.
TDeviceBox OutlineBox(const TRect& rect) {
    return {static_cast<double>(rect.left), static_cast<double>(rect.top), rect.right - 1.0,
            rect.bottom - 1.0};
}

TRect Sorted(const TRect& rect) {
    return {std::min(rect.left, rect.right), std::min(rect.top, rect.bottom),
            std::max(rect.left, rect.right), std::max(rect.top, rect.bottom)};
}

TSweep SweepBetween(const TDeviceBox& box, TPoint start, TPoint end) {
    return platform::SweepBetween(box, {double(start.x), double(start.y)},
                                  {double(end.x), double(end.y)});
}

/// Lack of memory draws nothing.
template <typename TWork>
void InMemory(const TWork& work) {
    try {
        work();
    } catch (const std::bad_alloc&) {
    } catch (const std::length_error&) {
    }
}

}  // namespace

std::unique_ptr<TPlatformCanvas> CreatePlatformCanvas(const TDrawTarget& target) {
    if (target.section == nullptr || target.section->DeviceContext() == nullptr ||
        target.width < 1 || target.height < 1) {
        return nullptr;
    }
    return std::unique_ptr<TPlatformCanvas>(new (std::nothrow) TGdiCanvas(target));
}

void ShowColors(const TDrawTarget& target) {
    if (target.bits_per_pixel > 8 || target.colors == nullptr) {
        return;
    }
    std::array<RGBQUAD, 256> entries{};
    const std::size_t wanted = target.bits_per_pixel == 1 ? 2 : entries.size();
    const std::size_t count = std::min(wanted, target.colors->size());
    for (std::size_t index = 0; index < count; ++index) {
        const TRGB color = (*target.colors)[index];
        entries[index] = {color.b, color.g, color.r, 0};
    }
    ::SetDIBColorTable(static_cast<HDC>(target.section->DeviceContext()), 0,
                       static_cast<UINT>(count), entries.data());
}

TGdiCanvas::TGdiCanvas(const TDrawTarget& target)
    : target_(target), context_(static_cast<HDC>(target.section->DeviceContext())) {
    ShowColors(target);
}

TDeviceBox TGdiCanvas::Neighbourhood(double margin) const {
    POINT origin{};
    ::GetViewportOrgEx(context_, &origin);
    return {-margin - origin.x, -margin - origin.y, target_.width + margin - origin.x,
            target_.height + margin - origin.y};
}

bool TGdiCanvas::IsNear(const TRect& rect) const {
    const std::array corners = {TPoint{rect.left, rect.top}, TPoint{rect.right, rect.bottom}};
    return AreNear(corners);
}

bool TGdiCanvas::AreNear(std::span<const TPoint> points) const {
    const TDeviceBox box = Neighbourhood(kNearReach);
    return std::all_of(points.begin(), points.end(), [&](TPoint point) {
        return box.Holds({static_cast<double>(point.x), static_cast<double>(point.y)});
    });
}

RECT TGdiCanvas::SeenPart(const TRect& rect) const {
    const TDeviceBox box = Neighbourhood(kNearReach);
    const auto limit = [](std::int32_t value, double first, double last) {
        return LONG{TruncToInt(std::clamp<double>(value, first, last))};
    };
    return {limit(rect.left, box.left, box.right), limit(rect.top, box.top, box.bottom),
            limit(rect.right, box.left, box.right), limit(rect.bottom, box.top, box.bottom)};
}

void TGdiCanvas::StrokeFar(const TPlainPen& pen, const TOutline& outline) {
    const TShapeScope shape(context_, pen, kEmptyBrush);
    const double width = std::clamp(pen.width, 1, kMaxPenWidth);
    const TDeviceBox box = Neighbourhood(kFillMargin + width * kPenWidthsSeen);
    for (TPolyline& run : CutLines(outline.Figures(), box)) {
        if (run.is_closed) {
            run.points.push_back(run.points.front());
        }
        const std::vector<POINT> native = NativePoints(run.points);
        if (shape.IsReady()) {
            ::Polyline(context_, native.data(), static_cast<int>(native.size()));
        }
    }
}

/// The lines that cut a far shape lie outside the target, but its outline must not follow them:
/// inside and outline are drawn apart.
void TGdiCanvas::DrawFar(const TPlainPen& pen, const TPlainBrush& brush, const TOutline& outline) {
    const TShapeScope shape(context_, kNoPen, brush);
    for (const TPolyline& figure : CutPolygons(outline.Figures(), Neighbourhood(kFillMargin))) {
        const std::vector<POINT> native = NativePoints(figure.points);
        if (shape.IsReady() && native.size() >= 3) {
            ::Polygon(context_, native.data(), static_cast<int>(native.size()));
        }
    }
    StrokeFar(pen, outline);
}

void TGdiCanvas::MoveTo(std::int32_t x, std::int32_t y) {
    ::MoveToEx(context_, x, y, nullptr);
}

void TGdiCanvas::LineTo(const TPlainPen& pen, std::int32_t x, std::int32_t y) {
    POINT position{};
    ::GetCurrentPositionEx(context_, &position);
    const std::array ends = {TPoint{position.x, position.y}, TPoint{x, y}};
    if (AreNear(ends)) {
        const TShapeScope shape(context_, pen, kEmptyBrush);
        if (shape.IsReady()) {
            ::LineTo(context_, x, y);
        }
    } else {
        InMemory([&] { StrokeFar(pen, LinesThrough(ends)); });
    }
    ::MoveToEx(context_, x, y, nullptr);
}

void TGdiCanvas::Polyline(const TPlainPen& pen, std::span<const TPoint> points) {
    InMemory([&] {
        if (!AreNear(points)) {
            StrokeFar(pen, LinesThrough(points));
            return;
        }
        const std::vector<POINT> native = NativePoints(points);
        const TShapeScope shape(context_, pen, kEmptyBrush);
        if (shape.IsReady()) {
            ::Polyline(context_, native.data(), static_cast<int>(native.size()));
        }
    });
}

void TGdiCanvas::Polygon(const TPlainPen& pen, const TPlainBrush& brush,
                         std::span<const TPoint> points) {
    InMemory([&] {
        if (!AreNear(points)) {
            TOutline outline = LinesThrough(points);
            outline.CloseFigure();
            DrawFar(pen, brush, outline);
            return;
        }
        const std::vector<POINT> native = NativePoints(points);
        const TShapeScope shape(context_, pen, brush);
        if (shape.IsReady()) {
            ::Polygon(context_, native.data(), static_cast<int>(native.size()));
        }
    });
}

void TGdiCanvas::FillRect(const TPlainBrush& brush, const TRect& rect) {
    const TShapeScope shape(context_, kNoPen, brush);
    const RECT native = SeenPart(rect);
    if (shape.IsReady() && brush.style != kNoBrush) {
        ::FillRect(context_, &native, static_cast<HBRUSH>(::GetCurrentObject(context_, OBJ_BRUSH)));
    }
}

void TGdiCanvas::Rectangle(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect) {
    if (!IsNear(rect)) {
        InMemory([&] {
            DrawFar(pen, brush, MakeOutline([&](TOutline& outline) {
                        outline.AddRectangle(OutlineBox(Sorted(rect)));
                    }));
        });
        return;
    }
    const TShapeScope shape(context_, pen, brush);
    if (shape.IsReady()) {
        ::Rectangle(context_, rect.left, rect.top, rect.right, rect.bottom);
    }
}

void TGdiCanvas::Ellipse(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect) {
    if (!IsNear(rect)) {
        InMemory([&] {
            DrawFar(pen, brush, MakeOutline([&](TOutline& outline) {
                        outline.AddEllipse(OutlineBox(Sorted(rect)));
                    }));
        });
        return;
    }
    const TShapeScope shape(context_, pen, brush);
    if (shape.IsReady()) {
        ::Ellipse(context_, rect.left, rect.top, rect.right, rect.bottom);
    }
}

void TGdiCanvas::RoundRect(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect,
                           std::int32_t corner_width, std::int32_t corner_height) {
    if (!IsNear(rect)) {
        InMemory([&] {
            DrawFar(pen, brush, MakeOutline([&](TOutline& outline) {
                        outline.AddRoundRect(OutlineBox(Sorted(rect)),
                                             std::abs(double(corner_width)),
                                             std::abs(double(corner_height)));
                    }));
        });
        return;
    }
    // Corners no larger than the rectangle: the same shape by smaller numbers.
    const TRect sorted = Sorted(rect);
    const auto limit = [](std::int32_t corner, std::int32_t side) {
        return TruncToInt(std::min(std::abs(static_cast<double>(corner)), double(side)));
    };
    const TShapeScope shape(context_, pen, brush);
    if (shape.IsReady()) {
        ::RoundRect(context_, sorted.left, sorted.top, sorted.right, sorted.bottom,
                    limit(corner_width, sorted.right - sorted.left),
                    limit(corner_height, sorted.bottom - sorted.top));
    }
}

void TGdiCanvas::Pie(const TPlainPen& pen, const TPlainBrush& brush, const TRect& rect,
                     TPoint start, TPoint end) {
    const std::array rays = {start, end};
    if (!IsNear(rect) || !AreNear(rays)) {
        InMemory([&] {
            const TDeviceBox box = OutlineBox(Sorted(rect));
            const TSweep angles = SweepBetween(box, start, end);
            DrawFar(pen, brush, MakeOutline([&](TOutline& outline) {
                        outline.AddPie(box, angles.start, angles.sweep);
                    }));
        });
        return;
    }
    const TShapeScope shape(context_, pen, brush);
    if (shape.IsReady()) {
        ::Pie(context_, rect.left, rect.top, rect.right, rect.bottom, start.x, start.y, end.x,
              end.y);
    }
}

void TGdiCanvas::Arc(const TPlainPen& pen, const TRect& rect, TPoint start, TPoint end) {
    const std::array rays = {start, end};
    if (!IsNear(rect) || !AreNear(rays)) {
        InMemory([&] {
            const TDeviceBox box = OutlineBox(Sorted(rect));
            const TSweep angles = SweepBetween(box, start, end);
            StrokeFar(pen, MakeOutline([&](TOutline& outline) {
                          outline.AddArc(box, angles.start, angles.sweep);
                      }));
        });
        return;
    }
    const TShapeScope shape(context_, pen, kEmptyBrush);
    if (shape.IsReady()) {
        ::Arc(context_, rect.left, rect.top, rect.right, rect.bottom, start.x, start.y, end.x,
              end.y);
    }
}

void TGdiCanvas::OffsetViewportOrg(std::int32_t dx, std::int32_t dy) {
    POINT origin{};
    ::GetViewportOrgEx(context_, &origin);
    ::SetViewportOrgEx(context_, SaturateToInt32(std::int64_t{origin.x} + dx),
                       SaturateToInt32(std::int64_t{origin.y} + dy), nullptr);
}

}  // namespace zm::platform
