// Sizing rule and dispatcher of the resampler. The dispatcher picks an engine by filter and
// pixel format, replaces filters that do not apply, and takes the alpha plane along.

#include "engine/proc/zmresample.h"

#include <cmath>
#include <memory>
#include <new>

#include "engine/foundation/zmsettings.h"
#include "engine/platform/memory.h"
#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

bool IsAreaFilter(TResampleFilter filter) {
    return filter == rfBilinear || filter == rfBicubic;
}

bool IsProjection(TResampleFilter filter) {
    return filter == rfProjectBW || filter == rfProjectWB;
}

bool IsPlatformFilter(TResampleFilter filter) {
    return filter >= rfWICNearestNeighbor && filter <= rfWICFant;
}

TAreaInterpolation InterpolationOf(TResampleFilter filter) {
    return filter == rfBicubic ? TAreaInterpolation::kCubic : TAreaInterpolation::kLinear;
}

bool HasAreaEngine(TZmPixelFormat format) {
    return format == zm8g || format == zm16g || format == zm24RGB || format == zm32RGB ||
           format == zm48RGB;
}

/// The filter that stands in where rfBilinear and rfBicubic have no engine. A default that could
/// not be dispatched either becomes the cheap rfFastLinear.
TResampleFilter ReplacementFilter() {
    const TResampleFilter filter = ZmGlobalSettings().fDefaultResampleFilter;
    const bool usable = filter < rfWICNearestNeighbor && !IsAreaFilter(filter);
    return usable ? filter : rfFastLinear;
}

bool ResampleBits(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                  const TResampleListener& listener) {
    if (IsProjection(filter)) {
        return ResampleProjection(source, target, filter);
    }
    if (filter == rfFastLinear || IsAreaFilter(filter)) {
        return ResampleBitsFastLinear(source, target);
    }
    if (IsPlatformFilter(filter)) {
        return ResampleScaler(source, target, filter);
    }
    return ResampleKernel(source, target, filter, listener);
}

/// The branch of zm8g and zm16g planes, which have no alpha of their own here.
bool ResampleGray(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                  const TResampleListener& listener) {
    if (filter == rfFastLinear || IsProjection(filter)) {
        return ResampleFastLinear(source, target, nullptr, listener);
    }
    if (IsPlatformFilter(filter)) {
        return ResampleScaler(source, target, filter);
    }
    if (IsAreaFilter(filter)) {
        return ResampleArea(source, target, nullptr, InterpolationOf(filter), listener);
    }
    return ResampleKernel(source, target, filter, listener);
}

/// A zm24RGB copy of a source in another format.
std::unique_ptr<TZmBitmap> MakeColorCopy(TZmBitmap& source) {
    auto copy = std::make_unique<TZmBitmap>();
    copy->SetBlackValue(source.GetBlackValue());
    copy->SetWhiteValue(source.GetWhiteValue());
    if (!copy->Allocate(source.GetWidth(), source.GetHeight(), zm24RGB)) {
        return nullptr;
    }
    copy->CopyAndConvertFormat(&source);
    copy->RemoveAlphaChannel(/*merge=*/false, 0);
    return copy;
}

bool ResampleAsColor(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                     const TResampleListener& listener) {
    std::unique_ptr<TZmBitmap> copy;
    TZmBitmap* color_source = &source;
    if (source.GetPixelFormat() != zm24RGB) {
        copy = MakeColorCopy(source);
        if (copy == nullptr) {
            return false;
        }
        color_source = copy.get();
    }
    if (IsProjection(filter)) {
        return ResampleProjection(*color_source, target, filter);
    }
    if (filter == rfFastLinear) {
        return ResampleFastLinear(*color_source, target, nullptr, listener);
    }
    return ResampleKernel(*color_source, target, filter, listener);
}

/// Every format but zm1g.
bool ResampleColors(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter, TZmBitmap* alpha,
                    const TResampleListener& listener) {
    const TZmPixelFormat format = source.GetPixelFormat();
    const bool same_format = target.GetPixelFormat() == format;
    if (source.GetWidth() == 1 && source.GetHeight() == 1) {
        return ResampleNearest(source, target);
    }
    if (IsPlatformFilter(filter)) {
        return ResampleScaler(source, target, filter);
    }
    if (IsAreaFilter(filter)) {
        if (same_format && HasAreaEngine(format)) {
            return ResampleArea(source, target, alpha, InterpolationOf(filter), listener);
        }
        filter = ReplacementFilter();
        if (filter == rfNone) {
            return ResampleNearest(source, target);
        }
    }
    if (same_format && (format == zm8g || format == zm16g)) {
        return ResampleGray(source, target, filter, listener);
    }
    return ResampleAsColor(source, target, filter, listener);
}

/// The source's plane, or a copy that fits the source where the plane itself does not (planes
/// can outlive a change of the image).
class TFittedPlane {
public:
    explicit TFittedPlane(TZmBitmap& source) : plane_(source.GetAlphaChannelRaw()) {
        if (plane_ == nullptr || plane_->IsEmpty()) {
            plane_ = nullptr;
        } else if (plane_->GetPixelFormat() != zm8g || plane_->GetWidth() != source.GetWidth() ||
                   plane_->GetHeight() != source.GetHeight()) {
            plane_ = MakeCopy(source);
        }
    }
    TZmBitmap* Get() const { return plane_; }

private:
    TZmBitmap* MakeCopy(TZmBitmap& source) {
        TZmBitmap gray;
        gray.AssignEx(plane_, /*with_params=*/false);
        if (!gray.SetPixelFormat(zm8g)) {
            return nullptr;
        }
        copy_ = TZmBitmap::CreateAsAlphaChannel(source.GetWidth(), source.GetHeight(), zmMemory);
        return ResampleNearest(gray, *copy_) ? copy_.get() : nullptr;
    }

    TZmBitmap* plane_;
    std::unique_ptr<TZmBitmap> copy_;
};

/// The target's plane, in the target's size.
TZmBitmap* FitTargetPlane(TZmBitmap& target) {
    TZmBitmap* plane = target.GetAlphaChannel();
    if (plane == nullptr) {
        return nullptr;
    }
    const bool fits = plane->GetPixelFormat() == zm8g && plane->GetWidth() == target.GetWidth() &&
                      plane->GetHeight() == target.GetHeight();
    if (!fits && !plane->Allocate(target.GetWidth(), target.GetHeight(), zm8g)) {
        return nullptr;
    }
    return plane->IsEmpty() ? nullptr : plane;
}

/// The plane takes the filter that was asked for, also where the image takes a replacement, and
/// reports no progress: the image's own count has ended already.
bool ResampleAlpha(TZmBitmap& source, TZmBitmap& target, TZmBitmap& alpha, TResampleFilter filter) {
    TZmBitmap* target_alpha = FitTargetPlane(target);
    if (target_alpha == nullptr) {
        return false;
    }
    const bool done = filter == rfNone
                          ? ResampleNearest(alpha, *target_alpha)
                          : ResampleGray(alpha, *target_alpha, filter, TResampleListener());
    target_alpha->SetFull(source.GetAlphaChannelRaw()->GetFull());
    return done;
}

std::int32_t SizeFromRatio(std::int32_t other_side, std::int32_t present,
                           std::int32_t present_other) {
    return SaturateToInt32(static_cast<std::int64_t>(other_side) * present / present_other);
}

/// One side of the sizing rule before the fit into a box.
std::int32_t ResolveSide(std::int32_t requested, std::int32_t other_side, std::int32_t present,
                         std::int32_t present_other) {
    std::int32_t side = present;
    if (requested == -1) {
        side = SizeFromRatio(other_side, present, present_other);
    } else if (requested != 0) {
        side = SaturateToInt32(std::abs(static_cast<std::int64_t>(requested)));
    }
    return side < 1 ? 1 : side;
}

TZmImageSize FitIntoBox(TZmImageSize box, std::int32_t present_width, std::int32_t present_height) {
    const double width = present_width;
    const double height = present_height;
    const bool width_limits = width / box.width > height / box.height;
    const double scale = width_limits ? box.width / width : box.height / height;
    TZmImageSize size{RoundHalfEven(width * scale), RoundHalfEven(height * scale)};
    size.width = size.width < 1 ? 1 : size.width;
    size.height = size.height < 1 ? 1 : size.height;
    return size;
}

}  // namespace

void RequireWorkMemory(std::int64_t count, std::int64_t element_bytes) {
    const auto bytes = CheckedMul(count, element_bytes);
    if (!bytes.has_value() || !FitsAddressSpace(*bytes)) {
        throw std::bad_alloc();
    }
    constexpr std::int64_t kSmall = std::int64_t{64} << 20;
    if (*bytes > kSmall) {
        const std::int64_t physical = platform::PhysicalMemoryBytes();
        if (physical > 0 && *bytes > physical) {
            throw std::bad_alloc();
        }
    }
}

bool FitTargetFormat(TZmBitmap& target, TZmPixelFormat format) {
    if (target.GetPixelFormat() == format) {
        return !target.IsEmpty();
    }
    const bool done = target.Allocate(target.GetWidth(), target.GetHeight(), format);
    // A platform bitmap cannot hold every format and takes one of its own instead.
    return done && target.GetPixelFormat() == format;
}

TZmImageSize CalcResampleSize(std::int32_t new_width, std::int32_t new_height,
                              std::int32_t present_width, std::int32_t present_height,
                              bool maintain_aspect_ratio) {
    const bool keep_aspect = maintain_aspect_ratio && new_width >= 1 && new_height >= 1;
    if ((new_width < 0 && new_height < 0) || present_width < 1 || present_height < 1) {
        return TZmImageSize{new_width, new_height};
    }
    TZmImageSize size;
    size.width = ResolveSide(new_width, new_height, present_width, present_height);
    size.height = ResolveSide(new_height, size.width, present_height, present_width);
    return keep_aspect ? FitIntoBox(size, present_width, present_height) : size;
}

bool ResampleBitmapInto(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter, void* sender,
                        const TZmBitmapProgressEvent& on_progress) {
    if (&source == &target || source.IsEmpty() || target.IsEmpty()) {
        return false;
    }
    if (source.GetWidth() == target.GetWidth() && source.GetHeight() == target.GetHeight()) {
        target.AssignEx(&source, /*with_params=*/false);
        return !target.IsEmpty();
    }
    const TResampleListener listener{sender, on_progress};
    const TFittedPlane alpha(source);
    bool done = false;
    if (filter == rfNone) {
        done = ResampleNearest(source, target);
    } else if (source.GetPixelFormat() == zm1g) {
        done = ResampleBits(source, target, filter, listener);
    } else {
        done = ResampleColors(source, target, filter, alpha.Get(), listener);
    }
    if (done && alpha.Get() != nullptr) {
        done = ResampleAlpha(source, target, *alpha.Get(), filter);
    }
    return done;
}

}  // namespace zm
