#pragma once

#include <array>
#include <cstdint>

#include "engine/bitmap/zmbitmapenums.h"
#include "engine/foundation/zmdefs.h"

namespace zm {

class TZmBitmap;

/// A pixel of any format, first byte first.
using TZmPixelBytes = std::array<std::uint8_t, 8>;

/// Fills the part of an inclusive rectangle that lies in the bitmap with a gradient across the
/// rectangle. `start` and `end` are pixels of the bitmap's format, of zm24RGB for zm1g and zm8p.
void FillGradient(TZmBitmap& bitmap, const TRect& rect, TZmGradientDirection direction,
                  const TZmPixelBytes& start, const TZmPixelBytes& end);

}  // namespace zm
