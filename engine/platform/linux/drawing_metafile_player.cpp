#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <utility>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/linux/drawing_metafile_p.h"

// State, objects, paths, lines and shapes. Pictures and texts stand in
// drawing_metafile_pictures.cpp.
namespace zm::platform {
namespace {

/// Records by number.
enum TRecordType : std::uint32_t {
    rtPolyBezier = 2,
    rtPolyPolyline = 7,
    rtPolyPolygon = 8,
    rtSetWindowExtent = 9,
    rtSetWindowOrigin = 10,
    rtSetViewportExtent = 11,
    rtSetViewportOrigin = 12,
    rtEnd = 14,
    rtSetMapMode = 17,
    rtSetBackMode = 18,
    rtSetFillMode = 19,
    rtSetTextAlign = 22,
    rtSetTextColor = 24,
    rtSetBackColor = 25,
    rtMoveTo = 27,
    rtIntersectClip = 30,
    rtSave = 33,
    rtRestore = 34,
    rtSetWorld = 35,
    rtModifyWorld = 36,
    rtSelect = 37,
    rtCreatePen = 38,
    rtCreateBrush = 39,
    rtDelete = 40,
    rtEllipse = 42,
    rtRectangle = 43,
    rtRoundRect = 44,
    rtArc = 45,
    rtChord = 46,
    rtPie = 47,
    rtLineTo = 54,
    rtArcTo = 55,
    rtSetArcDirection = 57,
    rtBeginPath = 59,
    rtEndPath = 60,
    rtCloseFigure = 61,
    rtFillPath = 62,
    rtStrokeAndFillPath = 63,
    rtStrokePath = 64,
    rtAbortPath = 68,
    rtSelectRegion = 75,
    rtCreateFont = 82,
    rtShortPoints = 85,  ///< from here on the lines with 16-bit coordinates
    rtShortPolyPolyline = 90,
    rtShortPolyPolygon = 91,
    rtCreateExtendedPen = 95,
};
/// Kinds of lines, counted from rtPolyBezier and from rtShortPoints.
enum TPointsKind : std::int32_t { lkBezier, lkPolygon, lkPolyline, lkBezierTo, lkLineTo };

enum TMapMode : std::int32_t { mmText = 1, mmTwips = 6, mmIsotropic = 7, mmAnisotropic = 8 };
constexpr std::uint32_t kStockMark = 0x80000000;
constexpr std::size_t kMostSavedStates = 1000;
constexpr std::size_t kMostPathPoints = std::size_t{1} << 22;
constexpr int kBezierLines = 16;
constexpr double kDegreesPerRadian = 57.295779513082320877;

/// Work that a metafile may ask for, in pixels: some hundred times the whole target and a good
/// deal besides. What goes on beyond it is not drawn, so that a small file cannot take hours.
constexpr double kBudgetBase = 2e9;
constexpr double kBudgetTargets = 500;
constexpr double kShapeCost = 1000;
constexpr double kPointCost = 50;

TArgb ReadColor(TZmByteReader& reader) {
    const std::uint8_t red = reader.U8();
    const std::uint8_t green = reader.U8();
    const std::uint8_t blue = reader.U8();
    reader.Skip(1);
    return MakeArgb(255, TRGB{blue, green, red});
}

TDevicePoint ReadPoint(TZmByteReader& reader) {
    const double x = reader.S32LE();
    return {x, static_cast<double>(reader.S32LE())};
}

TDevicePoint ReadShortPoint(TZmByteReader& reader) {
    const double x = static_cast<std::int16_t>(reader.U16LE());
    return {x, static_cast<double>(static_cast<std::int16_t>(reader.U16LE()))};
}

double ReadReal(TZmByteReader& reader) {
    return static_cast<double>(std::bit_cast<float>(reader.U32LE()));
}

TDeviceMatrix ReadMatrix(TZmByteReader& reader) {
    std::array<double, 6> v{};
    for (double& value : v) {
        value = ReadReal(reader);
    }
    return {v[0], v[1], v[2], v[3], v[4], v[5]};
}

/// The pen's joins by their bits: round, bevel, miter.
std::uint8_t JoinOf(std::uint32_t style) {
    const std::uint32_t join = style >> 12 & 3;
    return join == 0 ? std::uint8_t{2} : join == 1 ? std::uint8_t{1} : std::uint8_t{0};
}

}  // namespace

TMetafilePlayer::TMetafilePlayer(TLinuxGraphics& graphics, const TLinuxMetafile& metafile,
                                 const TDeviceMatrix& to_target)
    : graphics_(graphics),
      metafile_(metafile),
      to_target_(to_target),
      budget_(kBudgetBase +
              kBudgetTargets * graphics.raster_.Bounds().right * graphics.raster_.Bounds().bottom),
      objects_(metafile.HandleCount()) {
    SelectStock(7);  // a new context's pen, brush and font
    SelectStock(0);
    SelectStock(13);
}

void TMetafilePlayer::Play() {
    std::size_t place = 0;
    const std::int64_t painted_before = graphics_.raster_.PaintedPixels();
    while (const auto record = metafile_.NextRecord(place)) {
        const auto painted = graphics_.raster_.PaintedPixels() - painted_before;
        if (record->type == rtEnd || static_cast<double>(painted) > budget_) {
            break;
        }
        // One after another until it is one of theirs; each reads behind type and size.
        for (const auto play : {&TMetafilePlayer::PlaySetting, &TMetafilePlayer::PlayTransform,
                                &TMetafilePlayer::PlayClipping, &TMetafilePlayer::PlayObject,
                                &TMetafilePlayer::PlayLine, &TMetafilePlayer::PlayShape,
                                &TMetafilePlayer::PlayPicture, &TMetafilePlayer::PlayText}) {
            TZmByteReader reader(record->bytes);
            reader.Skip(8);
            if ((this->*play)(*record, reader)) {
                break;
            }
        }
        PlayPath(*record);
    }
}

bool TMetafilePlayer::Spend(double cost) {
    budget_ -= cost;
    return budget_ > 0;
}

// Settings.

bool TMetafilePlayer::PlaySetting(const TRecord& record, TZmByteReader& reader) {
    switch (record.type) {
        case rtSetBackMode: state_.is_opaque = reader.U32LE() == 2; return true;
        case rtSetFillMode: state_.is_winding = reader.U32LE() == 2; return true;
        case rtSetTextAlign: state_.text_align = reader.U32LE(); return true;
        case rtSetTextColor: state_.text_color = ReadColor(reader); return true;
        case rtSetBackColor: state_.back_color = ReadColor(reader); return true;
        case rtSetArcDirection: state_.is_clockwise = reader.U32LE() == 2; return true;
        case rtSave:
            if (saved_.size() < kMostSavedStates) {
                saved_.push_back(state_);
            }
            return true;
        case rtRestore: Restore(reader.S32LE()); return true;
        default: return false;
    }
}

/// Levels count from 1 with the first saved state, or back from the last one below 0.
void TMetafilePlayer::Restore(std::int32_t level) {
    const auto count = static_cast<std::int64_t>(saved_.size());
    const std::int64_t index = level < 0 ? count + level : std::int64_t{level} - 1;
    if (index < 0 || index >= count) {
        return;
    }
    state_ = saved_[static_cast<std::size_t>(index)];
    saved_.resize(static_cast<std::size_t>(index));
    SetClip(state_.clip);
}

bool TMetafilePlayer::PlayTransform(const TRecord& record, TZmByteReader& reader) {
    switch (record.type) {
        case rtSetWindowExtent: state_.window_extent = ReadPoint(reader); return true;
        case rtSetWindowOrigin: state_.window_origin = ReadPoint(reader); return true;
        case rtSetViewportExtent: state_.viewport_extent = ReadPoint(reader); return true;
        case rtSetViewportOrigin: state_.viewport_origin = ReadPoint(reader); return true;
        case rtSetMapMode: state_.map_mode = reader.S32LE(); return true;
        case rtSetWorld: state_.world = ReadMatrix(reader); return true;
        case rtModifyWorld: {
            const TDeviceMatrix step = ReadMatrix(reader);
            switch (reader.U32LE()) {
                case 1: state_.world = {}; break;
                case 2: state_.world = state_.world.After(step); break;
                case 3: state_.world = step.After(state_.world); break;
                case 4: state_.world = step; break;
                default: break;
            }
            return true;
        }
        default: return false;
    }
}

/// From the page's units to pixels of the recorded device.
TDeviceMatrix TMetafilePlayer::PageMatrix() const {
    constexpr std::array<double, 5> kMillimetres = {0.1, 0.01, 0.254, 0.0254, 25.4 / 1440};
    double scale_x = 1;
    double scale_y = 1;
    if (state_.map_mode > mmText && state_.map_mode <= mmTwips) {
        const double unit = kMillimetres[static_cast<std::size_t>(state_.map_mode - 2)];
        scale_x = unit * metafile_.PixelsPerMillimetreX();
        scale_y = -unit * metafile_.PixelsPerMillimetreY();
    } else if (state_.map_mode == mmIsotropic || state_.map_mode == mmAnisotropic) {
        scale_x = state_.viewport_extent.x / state_.window_extent.x;
        scale_y = state_.viewport_extent.y / state_.window_extent.y;
    }
    if (state_.map_mode == mmIsotropic) {
        const double scale = std::min(std::abs(scale_x), std::abs(scale_y));
        scale_x = std::copysign(scale, scale_x);
        scale_y = std::copysign(scale, scale_y);
    }
    return {scale_x,
            0,
            0,
            scale_y,
            state_.viewport_origin.x - state_.window_origin.x * scale_x,
            state_.viewport_origin.y - state_.window_origin.y * scale_y};
}

// Clipping, to rectangles.

void TMetafilePlayer::SetClip(const std::optional<TDeviceBox>& clip) {
    state_.clip = clip;
    graphics_.ResetClip();
    if (clip) {
        const TDeviceBox box = Intersect(*clip, graphics_.raster_.Bounds());
        TOutline outline({});
        outline.AddRectangle(
            {box.left, box.top, std::max(box.left, box.right), std::max(box.top, box.bottom)});
        graphics_.clip_ = outline.Figures();
    }
}

bool TMetafilePlayer::PlayClipping(const TRecord& record, TZmByteReader& reader) {
    constexpr std::uint32_t kIntersect = 1;
    if (record.type == rtIntersectClip) {
        const TDevicePoint first = ReadPoint(reader);
        const TDevicePoint last = ReadPoint(reader);
        const TDeviceBox box = MapBox(FullMatrix(), {first.x, first.y, last.x, last.y});
        SetClip(state_.clip ? Intersect(*state_.clip, box) : box);
        return true;
    }
    if (record.type != rtSelectRegion) {
        return false;
    }
    const std::uint32_t region_bytes = reader.U32LE();
    const bool is_intersected = reader.U32LE() == kIntersect && state_.clip;
    if (region_bytes == 0) {
        SetClip(std::nullopt);
        return true;
    }
    reader.Skip(16);  // of the region only its bounds
    const TDevicePoint first = ReadPoint(reader);
    const TDevicePoint last = ReadPoint(reader);
    const TDeviceBox box = MapBox(to_target_, {first.x, first.y, last.x, last.y});
    if (!reader.HasFailed()) {
        SetClip(is_intersected ? Intersect(*state_.clip, box) : box);
    }
    return true;
}

// Objects.

void TMetafilePlayer::Keep(std::uint32_t handle, TObject object) {
    if (handle < objects_.size()) {
        objects_[handle] = std::move(object);
    }
}

void TMetafilePlayer::Select(std::uint32_t handle) {
    if (handle >= kStockMark) {
        SelectStock(handle - kStockMark);
        return;
    }
    if (handle >= objects_.size()) {
        return;
    }
    const TObject& object = objects_[handle];
    if (const auto* const pen = std::get_if<TPen>(&object)) {
        state_.pen = *pen;
    } else if (const auto* const brush = std::get_if<TBrush>(&object)) {
        state_.brush = *brush;
    } else if (const auto* const font = std::get_if<TFontObject>(&object)) {
        state_.font = *font;
    }
}

/// The system's own objects: brushes from white to black and none, pens, fonts.
void TMetafilePlayer::SelectStock(std::uint32_t number) {
    constexpr std::array<TArgb, 5> kBrushes = {0xFFFFFFFF, 0xFFC0C0C0, 0xFF808080, 0xFF404040,
                                               0xFF000000};
    constexpr std::uint32_t kNoBrush = 5;
    constexpr std::uint32_t kWhitePen = 6;
    constexpr std::uint32_t kNoPen = 8;
    constexpr std::uint32_t kFirstFont = 10;
    constexpr std::uint32_t kLastFont = 17;
    constexpr std::int32_t kStockFontHeight = 16;
    if (number <= kNoBrush) {
        const bool is_visible = number < kNoBrush;
        state_.brush = {{vbSolid, is_visible ? kBrushes[number] : 0, 0, 0, {}, {}}, is_visible};
    } else if (number <= kNoPen) {
        const TArgb color = number == kWhitePen ? 0xFFFFFFFF : 0xFF000000;
        state_.pen = {{color, 1, 0, 0}, number != kNoPen, /*is_cosmetic=*/true};
    } else if (number >= kFirstFont && number <= kLastFont) {
        state_.font = {};
        state_.font.font.family = number <= kFirstFont + 1 ? u"Courier New" : u"Arial";
        state_.font.font.height = kStockFontHeight;
    }
}

bool TMetafilePlayer::PlayObject(const TRecord& record, TZmByteReader& reader) {
    constexpr std::uint32_t kNoLine = 5;
    const std::uint32_t handle = reader.U32LE();
    switch (record.type) {
        case rtSelect: Select(handle); return true;
        case rtDelete: Keep(handle, {}); return true;
        case rtCreatePen:
        case rtCreateExtendedPen: {
            const bool is_extended = record.type == rtCreateExtendedPen;
            reader.Skip(is_extended ? 16 : 0);
            const std::uint32_t style = reader.U32LE();
            TPen pen;
            pen.record.width = static_cast<float>(reader.S32LE());
            reader.Skip(4);  // the height of a width, or the kind of brush
            pen.record.color = ReadColor(reader);
            pen.record.dash = static_cast<std::uint8_t>(style & 15);
            pen.record.join = JoinOf(style);
            pen.is_visible = pen.record.dash != kNoLine;
            pen.is_cosmetic = is_extended && (style & 0x10000) == 0;
            Keep(handle, pen);
            return true;
        }
        case rtCreateBrush: {
            const std::uint32_t style = reader.U32LE();
            TBrush brush;
            brush.record.kind = style == 2 ? vbHatch : vbSolid;
            brush.record.color = ReadColor(reader);
            brush.record.hatch = static_cast<std::uint8_t>(std::min(reader.U32LE(), 5U));
            brush.is_visible = style == 0 || style == 2;
            Keep(handle, brush);
            return true;
        }
        case rtCreateFont: {
            TFontObject object;
            object.font.height = reader.S32LE();
            reader.Skip(4);
            object.angle = -reader.S32LE() / 10.0;
            reader.Skip(4);
            object.font.bold = reader.S32LE() >= 600;
            object.font.italic = reader.U8() != 0;
            object.font.underline = reader.U8() != 0;
            object.font.strike_out = reader.U8() != 0;
            reader.Skip(5);
            for (int i = 0; i < 32; ++i) {
                const std::uint16_t unit = reader.U16LE();
                if (unit == 0) {
                    break;
                }
                object.font.family.push_back(static_cast<char16_t>(unit));
            }
            Keep(handle, object);
            return true;
        }
        default: return false;
    }
}

TVectorPenRecord TMetafilePlayer::PenRecord() const {
    TVectorPenRecord pen = state_.pen.record;
    const double scale = std::sqrt(std::abs(FullMatrix().Determinant()));
    pen.width = state_.pen.is_cosmetic ? 1 : static_cast<float>(std::abs(pen.width) * scale);
    return pen;
}

TVectorBrushRecord TMetafilePlayer::BrushRecord() const {
    TVectorBrushRecord brush = state_.brush.record;
    brush.back_color = state_.is_opaque ? state_.back_color : 0;
    return brush;
}

// Painting. Figures are added to the open path, or painted at once.

void TMetafilePlayer::Paint(std::int32_t painting, const TOutline& outline) {
    const double cost = kShapeCost + kPointCost * static_cast<double>(outline.PointCount());
    if (!Spend(cost) || !outline.Bounds()) {
        return;
    }
    if ((painting & kFilled) != 0 && state_.brush.is_visible) {
        graphics_.Fill(BrushRecord(), outline,
                       state_.is_winding ? CAIRO_FILL_RULE_WINDING : CAIRO_FILL_RULE_EVEN_ODD);
    }
    if ((painting & kStroked) != 0 && state_.pen.is_visible) {
        const TVectorPenRecord pen = PenRecord();
        if (std::isfinite(pen.width)) {
            graphics_.Stroke(pen, outline);
        }
    }
}

template <typename TAdd>
void TMetafilePlayer::Draw(std::int32_t painting, const TAdd& add) {
    if (is_path_open_) {
        if (path_->PointCount() < kMostPathPoints) {
            path_->SetMatrix(FullMatrix());
            add(*path_);
        }
        return;
    }
    TOutline outline(FullMatrix());
    add(outline);
    Paint(painting, outline);
}

bool TMetafilePlayer::PlayPath(const TRecord& record) {
    const auto paint = [&](std::int32_t painting) {
        if (const auto path = std::exchange(path_, std::nullopt)) {
            Paint(painting, *path);
        }
        is_path_open_ = false;
        return true;
    };
    switch (record.type) {
        case rtBeginPath:
            path_.emplace(FullMatrix());
            is_path_open_ = true;
            return true;
        case rtEndPath: is_path_open_ = false; return true;
        case rtAbortPath: return paint(0);
        case rtCloseFigure:
            if (is_path_open_) {
                path_->CloseFigure();
            }
            return true;
        case rtFillPath: return paint(kFilled);
        case rtStrokePath: return paint(kStroked);
        case rtStrokeAndFillPath: return paint(kFilled | kStroked);
        default: return false;
    }
}

// Lines.

/// Cubic curves, each from the last point by two handles to its end.
void TMetafilePlayer::AddBeziers(TOutline& outline, std::span<const TDevicePoint> points) const {
    for (std::size_t i = 3; i < points.size(); i += 3) {
        const TDevicePoint p[] = {points[i - 3], points[i - 2], points[i - 1], points[i]};
        for (int step = 1; step <= kBezierLines; ++step) {
            const double t = static_cast<double>(step) / kBezierLines;
            const double u = 1 - t;
            const double w[] = {u * u * u, 3 * u * u * t, 3 * u * t * t, t * t * t};
            outline.AddPoint(w[0] * p[0].x + w[1] * p[1].x + w[2] * p[2].x + w[3] * p[3].x,
                             w[0] * p[0].y + w[1] * p[1].y + w[2] * p[2].y + w[3] * p[3].y);
        }
    }
}

void TMetafilePlayer::PlayPoints(std::int32_t kind, bool is_short, TZmByteReader& reader) {
    reader.Skip(16);  // bounds
    const std::uint32_t count = reader.U32LE();
    if (reader.Remaining() / (is_short ? 4 : 8) < count || count == 0) {
        return;
    }
    const bool continues = kind == lkBezierTo || kind == lkLineTo;
    std::vector<TDevicePoint> points;
    points.reserve(count + 1);
    if (continues) {
        points.push_back(state_.position);
    }
    for (std::uint32_t i = 0; i < count; ++i) {
        points.push_back(is_short ? ReadShortPoint(reader) : ReadPoint(reader));
    }
    if (continues) {
        state_.position = points.back();
    }
    Draw(kind == lkPolygon ? kFilled | kStroked : kStroked, [&](TOutline& outline) {
        if (!continues) {
            outline.StartFigure();
        }
        outline.AddPoint(points.front().x, points.front().y);
        if (kind == lkBezier || kind == lkBezierTo) {
            AddBeziers(outline, points);
        } else {
            for (const TDevicePoint& point : points) {
                outline.AddPoint(point.x, point.y);
            }
        }
        if (kind == lkPolygon) {
            outline.CloseFigure();
        }
    });
}

void TMetafilePlayer::PlayManyPoints(bool is_closed, bool is_short, TZmByteReader& reader) {
    reader.Skip(16);
    const std::uint32_t figures = reader.U32LE();
    const std::uint32_t count = reader.U32LE();
    if (reader.Remaining() / 4 < figures) {
        return;
    }
    std::vector<std::uint32_t> lengths(figures);
    for (std::uint32_t& length : lengths) {
        length = reader.U32LE();
    }
    if (reader.Remaining() / (is_short ? 4 : 8) < count) {
        return;
    }
    Draw(is_closed ? kFilled | kStroked : kStroked, [&](TOutline& outline) {
        std::uint32_t rest = count;
        for (const std::uint32_t length : lengths) {
            outline.StartFigure();
            for (std::uint32_t i = 0; i < length && rest > 0; ++i, --rest) {
                const TDevicePoint point = is_short ? ReadShortPoint(reader) : ReadPoint(reader);
                outline.AddPoint(point.x, point.y);
            }
            if (is_closed) {
                outline.CloseFigure();
            }
        }
    });
}

bool TMetafilePlayer::PlayLine(const TRecord& record, TZmByteReader& reader) {
    const bool is_short = record.type >= rtShortPoints;
    const std::uint32_t kind = record.type - (is_short ? rtShortPoints : rtPolyBezier);
    if (kind <= lkLineTo) {
        PlayPoints(static_cast<std::int32_t>(kind), is_short, reader);
        return true;
    }
    switch (record.type) {
        case rtPolyPolyline:
        case rtShortPolyPolyline:
            PlayManyPoints(/*is_closed=*/false, is_short, reader);
            return true;
        case rtPolyPolygon:
        case rtShortPolyPolygon: PlayManyPoints(/*is_closed=*/true, is_short, reader); return true;
        case rtMoveTo:
            state_.position = ReadPoint(reader);
            if (is_path_open_) {
                path_->StartFigure();
            }
            return true;
        case rtLineTo: {
            const TDevicePoint from = std::exchange(state_.position, ReadPoint(reader));
            Draw(kStroked, [&](TOutline& outline) {
                outline.AddPoint(from.x, from.y);
                outline.AddPoint(state_.position.x, state_.position.y);
            });
            return true;
        }
        default: return false;
    }
}

// Shapes. Their right and bottom pixels are left out, and pens run through the middles of pixels.

TDeviceBox TMetafilePlayer::FrameOf(TZmByteReader& reader) const {
    const TDevicePoint first = ReadPoint(reader);
    const TDevicePoint last = ReadPoint(reader);
    const TDeviceMatrix page = to_target_.After(PageMatrix());
    const double pixel_x = page.m11 != 0 ? 1 / std::abs(page.m11) : 0;
    const double pixel_y = page.m22 != 0 ? 1 / std::abs(page.m22) : 0;
    const TDevicePoint corner{std::min(first.x, last.x), std::min(first.y, last.y)};
    return {corner.x, corner.y, std::max({first.x, last.x, corner.x + pixel_x}) - pixel_x,
            std::max({first.y, last.y, corner.y + pixel_y}) - pixel_y};
}

/// Parts of an ellipse from the ray through one point to that through another, counter-clockwise
/// unless the arcs' direction is set otherwise.
void TMetafilePlayer::PlayArc(std::uint32_t type, TZmByteReader& reader) {
    const TDeviceBox frame = FrameOf(reader);
    const TDevicePoint start = ReadPoint(reader);
    const TDevicePoint end = ReadPoint(reader);
    const double center_x = (frame.left + frame.right) / 2;
    const double center_y = (frame.top + frame.bottom) / 2;
    auto [first, sweep] = SweepBetween(frame, start, end);
    // Where the page counts upward the way round is turned with it.
    if (state_.is_clockwise != (FullMatrix().Determinant() < 0)) {
        sweep += sweep > -360 ? 360 : 720;
    }
    const bool is_closed = type == rtChord || type == rtPie;
    Draw(is_closed ? kFilled | kStroked : kStroked, [&](TOutline& outline) {
        if (type == rtArcTo) {
            outline.AddPoint(state_.position.x, state_.position.y);
        } else {
            outline.StartFigure();
        }
        if (type == rtPie) {
            outline.AddPoint(center_x, center_y);
        }
        outline.AddArc(frame, first, sweep);
        if (is_closed) {
            outline.CloseFigure();
        }
    });
    if (type == rtArcTo) {
        const double radians = (first + sweep) / kDegreesPerRadian;
        const double width = frame.right - frame.left;
        const double height = frame.bottom - frame.top;
        const double across = std::hypot(std::cos(radians) * height, std::sin(radians) * width);
        const double radius = across > 0 ? width * height / across / 2 : 0;
        state_.position = {center_x + radius * std::cos(radians),
                           center_y + radius * std::sin(radians)};
    }
}

bool TMetafilePlayer::PlayShape(const TRecord& record, TZmByteReader& reader) {
    switch (record.type) {
        case rtRectangle: {
            const TDeviceBox frame = FrameOf(reader);
            Draw(kFilled | kStroked, [&](TOutline& outline) { outline.AddRectangle(frame); });
            return true;
        }
        case rtEllipse: {
            const TDeviceBox frame = FrameOf(reader);
            Draw(kFilled | kStroked, [&](TOutline& outline) { outline.AddEllipse(frame); });
            return true;
        }
        case rtRoundRect: {
            const TDeviceBox frame = FrameOf(reader);
            const TDevicePoint corner = ReadPoint(reader);
            Draw(kFilled | kStroked, [&](TOutline& outline) {
                outline.AddRoundRect(frame, std::abs(corner.x), std::abs(corner.y));
            });
            return true;
        }
        case rtArc:
        case rtArcTo:
        case rtChord:
        case rtPie: PlayArc(record.type, reader); return true;
        default: return false;
    }
}

}  // namespace zm::platform
