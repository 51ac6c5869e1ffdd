#pragma once

#include <cstdint>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"

/// Changing the pixel size of a bitmap: the sizing rule and the dispatcher. The engines behind it
/// (zmresample_p.h) differ on purpose in rounding, sample alignment and edge treatment: the same
/// image scaled by two filters does not differ by the filter kernel alone.
namespace zm {

struct TZmImageSize {
    std::int32_t width = 0;
    std::int32_t height = 0;
    friend bool operator==(const TZmImageSize&, const TZmImageSize&) = default;
};

/// The sizing rule. -1 follows the other side, 0 keeps the present side, other negative values
/// count by their absolute value; every result is at least 1 and products do not wrap. With
/// `maintain_aspect_ratio`, and both sides at least 1, the image is fitted inside the box, which
/// enlarges as well as shrinks. Two negative sizes, and any request for an empty image, come back
/// unchanged.
TZmImageSize CalcResampleSize(std::int32_t new_width, std::int32_t new_height,
                              std::int32_t present_width, std::int32_t present_height,
                              bool maintain_aspect_ratio);

/// The dispatcher. `target` has its final size; its pixels, and its alpha plane when `source`
/// has one, are written. `source` is left as it is.
///
/// The engine for a filter and a format decides the format of the result: rfNone keeps it, so do
/// the one-channel grey formats and, under rfBilinear and rfBicubic, zm24RGB, zm32RGB and
/// zm48RGB; the projections give zm1g; all else gives zm24RGB. A filter that does not apply to a
/// format is replaced by the settings' default filter without notice.
///
/// `on_progress` may be empty; the kernel filters call it from a worker thread. False when there
/// is no result (an empty image, no room for the target's format): the target is then undefined.
/// Exceptions of the allocator and of `on_progress` pass through.
bool ResampleBitmapInto(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter, void* sender,
                        const TZmBitmapProgressEvent& on_progress);

}  // namespace zm
