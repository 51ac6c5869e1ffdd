#pragma once

#include <cstdint>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"

/// Turning and mirroring a bitmap: the choice of an engine and the flips. The engines stand in
/// zmrotate_p.h.
///
/// Angles are degrees, positive counter-clockwise. The result holds the whole turned picture and
/// is larger for it; what the picture leaves free takes the background. Whole quarter turns copy
/// pixels exactly in every format and mode.
///
/// At other angles three engines stand ready:
/// - zm24RGB with zmrBilinear or zmrBicubic is mapped back pixel by pixel and interpolated; the
///   edges blend into the background;
/// - zm24RGB with zmrFast, and zm1g with any antialiasing, take three shears; zm1g without mixing
///   pixels. Angles are held to 1/1000 degree there;
/// - everything else copies the nearest sample. `background` then is a value as Fill takes it:
///   for zm8p and zm8g its low byte, for zm1g any value but 0 sets the bits.
///
/// The alpha plane takes the same engine, with 0 as background: what lies beside the picture is
/// transparent.
namespace zm {

enum class TRotateOutcome : std::uint8_t {
    kRotated,    ///< the target holds the result
    kUnchanged,  ///< the angle turns nothing; the target is not written
    kFailed,     ///< no room, or nothing to turn; the target is undefined
};

/// Writes the turned image and its alpha plane to `target`, which keeps its own place settings
/// and is allocated here. `source` is only read. `on_progress` may be empty; an exception that
/// leaves it passes through.
[[nodiscard]] TRotateOutcome RotateBitmapInto(TZmBitmap& source, TZmBitmap& target, double angle,
                                              TZmAntialiasMode mode, TColor background,
                                              void* sender,
                                              const TZmBitmapProgressEvent& on_progress);

/// Mirrors an image and its alpha plane in place; fdNone does nothing. Does not call Changed.
void FlipBitmap(TZmBitmap& bitmap, TFlipDir direction);

}  // namespace zm
