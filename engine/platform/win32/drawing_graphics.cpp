#include "engine/platform/win32/drawing_graphics_p.h"

#include <algorithm>
#include <cmath>

#include "engine/platform/win32/drawing_plain_p.h"

// Opening a target, modes, transform and clipping. The shapes stand in drawing_shapes.cpp, text in
// drawing_text.cpp.
namespace zm::platform {
namespace {

/// How far beyond the target a coordinate may lie for the library to see it. The library and the
/// drawing beneath it work in narrower numbers and by rows, whether these are seen or not.
constexpr double kNearReach = 32768;
/// The widest pen on the target, with the same reason.
constexpr double kMaxPenWidth = 1 << 20;
/// Bound of coordinates under a transform that is not parallel to the axes.
constexpr double kFarthestClip = 1 << 20;

template <typename TMode>
bool IsMode(std::int32_t value, TMode last) {
    return value >= 0 && value <= static_cast<std::int32_t>(last);
}

bool IsFinite(TDevicePoint point) {
    return std::isfinite(point.x) && std::isfinite(point.y);
}

TDeviceMatrix ToMatrix(const TDrawMatrix& matrix) {
    return {matrix.m11, matrix.m12, matrix.m21, matrix.m22, matrix.dx, matrix.dy};
}

}  // namespace

std::unique_ptr<TVectorGraphics> CreateVectorGraphics(const TDrawTarget& target) {
    try {
        auto drawing = std::make_unique<TGdiPlusDrawing>(target);
        if (drawing->Open()) {
            return drawing;
        }
    } catch (const std::bad_alloc&) {
    }
    return nullptr;
}

bool TGdiPlusDrawing::Open() {
    if (target_.section == nullptr || target_.width < 1 || target_.height < 1) {
        return false;
    }
    const bool is_palette = target_.bits_per_pixel == 1 || target_.bits_per_pixel == 8;
    const bool is_open = is_palette ? OpenContext() : OpenPicture();
    return is_open && Call<&TGdiPlusEntries::GdipSetPageUnit>(Gdiplus::UnitPixel);
}

bool TGdiPlusDrawing::OpenPicture() {
    const TGdiPlusEntries* entries = GdiPlus();
    const bool has_alpha = target_.bits_per_pixel == 32;
    if (entries == nullptr || (!has_alpha && target_.bits_per_pixel != 24)) {
        return false;
    }
    const std::int64_t row_bytes =
        (static_cast<std::int64_t>(target_.width) * target_.bits_per_pixel + 31) / 32 * 4;
    std::uint8_t* const top_row = target_.section->Bits() + row_bytes * (target_.height - 1);
    // Rows lie bottom first: a negative step from the top one.
    return IsDone(entries->GdipCreateBitmapFromScan0(
               target_.width, target_.height, static_cast<INT>(-row_bytes),
               has_alpha ? PixelFormat32bppARGB : PixelFormat24bppRGB, top_row,
               picture_.Receive())) &&
           IsDone(entries->GdipGetImageGraphicsContext(picture_.Get(), graphics_.Receive()));
}

bool TGdiPlusDrawing::OpenContext() {
    const TGdiPlusEntries* entries = GdiPlus();
    const auto context = static_cast<HDC>(target_.section->DeviceContext());
    if (entries == nullptr || context == nullptr) {
        return false;
    }
    context_ = context;
    ShowColors(target_);
    const TContextScope scope(context_);
    return IsDone(
        entries->GdipCreateFromHDC2(context_, target_.section->Handle(), graphics_.Receive()));
}

bool TGdiPlusDrawing::SetSmoothingMode(std::int32_t mode) {
    return IsMode(mode, Gdiplus::SmoothingModeAntiAlias) &&
           Call<&TGdiPlusEntries::GdipSetSmoothingMode>(static_cast<Gdiplus::SmoothingMode>(mode));
}

bool TGdiPlusDrawing::SetTextRenderingHint(std::int32_t hint) {
    const auto native = static_cast<Gdiplus::TextRenderingHint>(hint);
    const bool is_set = IsMode(hint, Gdiplus::TextRenderingHintClearTypeGridFit) &&
                        Call<&TGdiPlusEntries::GdipSetTextRenderingHint>(native);
    hint_ = is_set ? native : hint_;
    return is_set;
}

bool TGdiPlusDrawing::SetInterpolationMode(std::int32_t mode) {
    const auto native = static_cast<Gdiplus::InterpolationMode>(mode);
    const bool is_set = IsMode(mode, Gdiplus::InterpolationModeHighQualityBicubic) &&
                        Call<&TGdiPlusEntries::GdipSetInterpolationMode>(native);
    interpolation_ = is_set ? native : interpolation_;
    return is_set;
}

bool TGdiPlusDrawing::SetCompositingMode(std::int32_t mode) {
    const auto native = static_cast<Gdiplus::CompositingMode>(mode);
    const bool is_set = IsMode(mode, Gdiplus::CompositingModeSourceCopy) &&
                        Call<&TGdiPlusEntries::GdipSetCompositingMode>(native);
    copies_ = is_set ? native == Gdiplus::CompositingModeSourceCopy : copies_;
    return is_set;
}

bool TGdiPlusDrawing::SetCompositingQuality(std::int32_t quality) {
    return IsMode(quality, Gdiplus::CompositingQualityAssumeLinear) &&
           Call<&TGdiPlusEntries::GdipSetCompositingQuality>(
               static_cast<Gdiplus::CompositingQuality>(quality));
}

/// The library's own transform is the one that counts; kept here for the reach of shapes.
bool TGdiPlusDrawing::ReadTransform() {
    const TGdiPlusEntries* entries = GdiPlus();
    TGdiPlusMatrix matrix;
    float values[6] = {};
    if (entries == nullptr || !IsDone(entries->GdipCreateMatrix(matrix.Receive())) ||
        !Call<&TGdiPlusEntries::GdipGetWorldTransform>(matrix.Get()) ||
        !IsDone(entries->GdipGetMatrixElements(matrix.Get(), values))) {
        return false;
    }
    matrix_ = {values[0], values[1], values[2], values[3], values[4], values[5]};
    return true;
}

bool TGdiPlusDrawing::RotateTransform(float angle) {
    return std::isfinite(angle) &&
           Call<&TGdiPlusEntries::GdipRotateWorldTransform>(std::fmod(angle, 360.0F),
                                                            Gdiplus::MatrixOrderPrepend) &&
           ReadTransform();
}

bool TGdiPlusDrawing::TranslateTransform(float dx, float dy) {
    return std::isfinite(dx) && std::isfinite(dy) &&
           Call<&TGdiPlusEntries::GdipTranslateWorldTransform>(dx, dy,
                                                               Gdiplus::MatrixOrderPrepend) &&
           ReadTransform();
}

bool TGdiPlusDrawing::ScaleTransform(float sx, float sy) {
    return std::isfinite(sx) && std::isfinite(sy) &&
           Call<&TGdiPlusEntries::GdipScaleWorldTransform>(sx, sy, Gdiplus::MatrixOrderPrepend) &&
           ReadTransform();
}

bool TGdiPlusDrawing::ResetTransform() {
    return Call<&TGdiPlusEntries::GdipResetWorldTransform>() && ReadTransform();
}

bool TGdiPlusDrawing::SetTransform(const TDrawMatrix& matrix) {
    const TGdiPlusEntries* entries = GdiPlus();
    TGdiPlusMatrix copy;
    return entries != nullptr &&
           IsDone(entries->GdipCreateMatrix2(matrix.m11, matrix.m12, matrix.m21, matrix.m22,
                                             matrix.dx, matrix.dy, copy.Receive())) &&
           Call<&TGdiPlusEntries::GdipSetWorldTransform>(copy.Get()) && ReadTransform();
}

TDevicePoint TGdiPlusDrawing::ToDevice(TDevicePoint point) const {
    return ToMatrix(matrix_).Map(point.x, point.y);
}

std::optional<TDevicePoint> TGdiPlusDrawing::ToWorld(TDevicePoint point) const {
    const auto inverse = ToMatrix(matrix_).Inverse();
    const TDevicePoint world = inverse ? inverse->Map(point.x, point.y) : TDevicePoint{};
    return inverse && IsFinite(world) ? std::optional(world) : std::nullopt;
}

TOutline TGdiPlusDrawing::DeviceOutline() const {
    return TOutline(ToMatrix(matrix_));
}

double TGdiPlusDrawing::LargestScale() const {
    return std::max(std::hypot(matrix_.m11, matrix_.m12), std::hypot(matrix_.m21, matrix_.m22));
}

TDeviceBox TGdiPlusDrawing::Neighbourhood(double margin) const {
    return {-margin, -margin, target_.width + margin, target_.height + margin};
}

TGdiPlusDrawing::TReach TGdiPlusDrawing::ReachOf(std::span<const TDrawPoint> points) const {
    const TDeviceBox box = Neighbourhood(kNearReach);
    TReach reach = TReach::kNear;
    for (const TDrawPoint& point : points) {
        const TDevicePoint device = ToDevice({point.x, point.y});
        if (!IsFinite(device)) {
            return TReach::kNowhere;
        }
        if (!box.Holds(device)) {
            reach = TReach::kFar;
        }
    }
    return reach;
}

TGdiPlusDrawing::TReach TGdiPlusDrawing::ReachOf(const TDrawRect& rect) const {
    const float right = rect.x + rect.width;
    const float bottom = rect.y + rect.height;
    const TDrawPoint corners[] = {
        {rect.x, rect.y}, {right, rect.y}, {right, bottom}, {rect.x, bottom}};
    return ReachOf(corners);
}

TGdiPlusDrawing::TReach TGdiPlusDrawing::ReachOf(const TDrawPath& path) const {
    TReach reach = TReach::kNear;
    for (const TDrawPathPart& part : path) {
        const TDrawPoint ends[] = {part.from, part.to};
        const bool angles_count = std::isfinite(part.start_angle + part.sweep_angle);
        const TReach next = !angles_count         ? TReach::kNowhere
                            : part.kind == pkArc  ? ReachOf(part.bounds)
                            : part.kind == pkLine ? ReachOf(ends)
                                                  : TReach::kNear;
        reach = std::max(reach, next);
    }
    return reach;
}

bool TGdiPlusDrawing::PenIsUsable(const TVectorPen& pen) const {
    const double width = static_cast<const TGdiPlusVectorPen&>(pen).width * LargestScale();
    return width <= kMaxPenWidth;
}

TDeviceBox TGdiPlusDrawing::SeenBox(const TDrawRect& box) const {
    const TDeviceBox hull = MapBox(ToMatrix(matrix_), BoxOf(box));
    if (!std::isfinite(hull.left + hull.top + hull.right + hull.bottom)) {
        return {};
    }
    return {std::max(std::floor(hull.left), 0.0), std::max(std::floor(hull.top), 0.0),
            std::min<double>(std::ceil(hull.right), target_.width),
            std::min<double>(std::ceil(hull.bottom), target_.height)};
}

/// What a far clipping rectangle is cut to, so that the library's region stays small.
std::optional<TDeviceBox> TGdiPlusDrawing::ClipBounds() const {
    if (matrix_.m12 != 0 || matrix_.m21 != 0) {
        return TDeviceBox{-kFarthestClip, -kFarthestClip, kFarthestClip, kFarthestClip};
    }
    const TDeviceBox seen = Neighbourhood(kNearReach);
    const auto first = ToWorld({seen.left, seen.top});
    const auto last = ToWorld({seen.right, seen.bottom});
    if (!first || !last) {
        return std::nullopt;
    }
    return TDeviceBox{std::min(first->x, last->x), std::min(first->y, last->y),
                      std::max(first->x, last->x), std::max(first->y, last->y)};
}

bool TGdiPlusDrawing::SetClipRect(const TDrawRect& rect) {
    const TReach reach = ReachOf(rect);
    has_clip_ = has_clip_ || reach != TReach::kNowhere;
    if (reach == TReach::kNear) {
        return Call<&TGdiPlusEntries::GdipSetClipRect>(rect.x, rect.y, rect.width, rect.height,
                                                       Gdiplus::CombineModeReplace);
    }
    const auto box = reach == TReach::kFar ? ClipBounds() : std::nullopt;
    if (!box) {
        return false;
    }
    const double left = std::clamp<double>(rect.x, box->left, box->right);
    const double top = std::clamp<double>(rect.y, box->top, box->bottom);
    const double right = std::clamp<double>(rect.x + rect.width, box->left, box->right);
    const double bottom = std::clamp<double>(rect.y + rect.height, box->top, box->bottom);
    return Call<&TGdiPlusEntries::GdipSetClipRect>(
        static_cast<float>(left), static_cast<float>(top), static_cast<float>(right - left),
        static_cast<float>(bottom - top), Gdiplus::CombineModeReplace);
}

bool TGdiPlusDrawing::ResetClip() {
    has_clip_ = false;
    return Call<&TGdiPlusEntries::GdipResetClip>();
}

bool TGdiPlusDrawing::Flush() {
    const bool is_flushed = Call<&TGdiPlusEntries::GdipFlush>(Gdiplus::FlushIntentionSync);
    return ::GdiFlush() != FALSE && is_flushed;
}

bool TGdiPlusDrawing::DrawMetafile(const TDrawMetafile& metafile, const TDrawRect& rect) {
    // Its records are the system's to draw and cannot be cut to the target here.
    return ReachOf(rect) == TReach::kNear &&
           Call<&TGdiPlusEntries::GdipDrawImageRect>(
               static_cast<const TGdiPlusMetafile&>(metafile).metafile.Get(), rect.x, rect.y,
               rect.width, rect.height);
}

}  // namespace zm::platform
