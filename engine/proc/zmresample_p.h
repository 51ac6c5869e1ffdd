#pragma once

#include <cstdint>
#include <type_traits>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmnumbers.h"

/// The engines behind the resampling dispatcher, for it and the tests.
///
/// Common rules: both images have a size, and `source` is not `target`. A target whose format
/// does not fit is allocated anew in the engine's own. False when there is no room for that or
/// the formats do not apply; the target's pixels are then undefined. No engine changes `source`.
/// Each image is read or written one row at a time, so that file-backed images work.
namespace zm {

/// Who hears of the progress of an operation.
struct TResampleListener {
    void* sender = nullptr;
    TZmBitmapProgressEvent on_progress;
};

/// Reports Trunc(units * per_unit) to a listener whenever that number changes.
class TPercentReporter {
public:
    TPercentReporter(const TResampleListener& listener, double per_unit)
        : listener_(listener), per_unit_(per_unit) {}
    void Report(std::int64_t units) {
        if (!listener_.on_progress) {
            return;
        }
        const std::int32_t percent = TruncToInt(static_cast<double>(units) * per_unit_);
        if (percent != percentage_) {
            percentage_ = percent;
            listener_.on_progress(listener_.sender, percent);
        }
    }

private:
    const TResampleListener& listener_;
    double per_unit_;
    std::int32_t percentage_ = 0;
};

/// Sets the data access of an image for the duration of a scope.
class TAccessGuard {
public:
    TAccessGuard(TZmBitmap& bitmap, TZmDataAccess access) : bitmap_(bitmap), old_(bitmap.fAccess) {
        bitmap_.fAccess = access;
    }
    ~TAccessGuard() { bitmap_.fAccess = old_; }
    TAccessGuard(const TAccessGuard&) = delete;
    TAccessGuard& operator=(const TAccessGuard&) = delete;

private:
    TZmBitmap& bitmap_;
    TZmDataAccess old_;
};

/// A zero-filled work buffer. Raises std::bad_alloc for a count that the address space, or the
/// memory of the machine, cannot hold, before the system would start to swap for it.
template <typename T>
std::vector<T> MakeWorkBuffer(std::int64_t count);
void RequireWorkMemory(std::int64_t count, std::int64_t element_bytes);

template <typename T>
std::vector<T> MakeWorkBuffer(std::int64_t count) {
    RequireWorkMemory(count, static_cast<std::int64_t>(sizeof(T)));
    return std::vector<T>(static_cast<std::size_t>(count));
}

/// A value limited to the range of an 8-bit or 16-bit sample.
template <typename Sample>
constexpr Sample ClampSample(std::int32_t value) {
    if constexpr (std::is_same_v<Sample, std::uint8_t>) {
        return Clamp8(value);
    } else {
        return Clamp16(value);
    }
}

/// Brings a target into a format, keeping its size; the pixels are then undefined.
[[nodiscard]] bool FitTargetFormat(TZmBitmap& target, TZmPixelFormat format);

/// Copies the nearest sample, every pixel format; target format that of the source.
[[nodiscard]] bool ResampleNearest(TZmBitmap& source, TZmBitmap& target);

/// How the area engine reads between samples.
enum class TAreaInterpolation : std::uint8_t { kLinear, kCubic };

/// Area interpolation of rfBilinear and rfBicubic: equal formats, zm8g, zm24RGB, zm32RGB (8-bit
/// samples), zm16g, zm48RGB (16-bit samples). `alpha`: a zm8g plane of the source's size, or nil;
/// 8-bit samples only. Takes a fast form where there is one.
[[nodiscard]] bool ResampleArea(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                                TAreaInterpolation interpolation,
                                const TResampleListener& listener);

/// The plain form of ResampleArea: the law that the fast forms are measured against.
[[nodiscard]] bool ResampleAreaPlain(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                                     TAreaInterpolation interpolation,
                                     const TResampleListener& listener);

/// Whether a fast form stands for the plain one here: rfBilinear on zm8g and zm24RGB, both
/// sides shrinking, or both enlarging without partial alpha.
bool HasFastArea(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                 TAreaInterpolation interpolation);
/// The fast form; gives the same bytes. Only where HasFastArea says so.
[[nodiscard]] bool ResampleAreaFast(TZmBitmap& source, TZmBitmap& target,
                                    const TResampleListener& listener);

/// Two-pass separable filter with integer weights, rfTriangle to rfLinear: zm24RGB (worker
/// threads), zm8g, zm16g to the same format and zm1g to zm24RGB.
[[nodiscard]] bool ResampleKernel(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter,
                                  const TResampleListener& listener);

/// Integer-plane linear filter, shrinking by means: zm24RGB, zm8g, zm16g to the same format and
/// zm1g to zm24RGB. `inclusive_rect` limits the target pixels computed; nil, or one with right
/// and bottom -1, means all. (A zm1g source computes all in any case.)
[[nodiscard]] bool ResampleFastLinear(TZmBitmap& source, TZmBitmap& target,
                                      const TRect* inclusive_rect,
                                      const TResampleListener& listener);

/// The zm1g form of ResampleFastLinear.
[[nodiscard]] bool ResampleBitsFastLinear(TZmBitmap& source, TZmBitmap& target);
/// zm1g to zm24RGB greys, shrinking: the share of set bits in each target pixel's footprint.
[[nodiscard]] bool ReduceBits(TZmBitmap& source, TZmBitmap& target);

/// rfProjectBW and rfProjectWB: zm24RGB or zm1g to zm1g, keeping black (white) features.
[[nodiscard]] bool ResampleProjection(TZmBitmap& source, TZmBitmap& target,
                                      TResampleFilter filter);

/// rfWICNearestNeighbor, rfWICLinear, rfWICCubic, rfWICFant: every format to itself, but zm1g
/// and zm8p to zm24RGB.
[[nodiscard]] bool ResampleScaler(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter);

}  // namespace zm
