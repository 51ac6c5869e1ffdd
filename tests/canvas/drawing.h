#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/canvas/zmgdiplus.h"
#include "engine/foundation/zmdefs.h"

namespace zm::test {

/// A transparent picture with an antialiasing canvas over it, red pen and blue brush.
class TDrawing {
public:
    TDrawing(std::int32_t width, std::int32_t height, TBitmapPixelFormat format = pf32bit,
             bool anti_alias = true, bool use_library = true);
    ~TDrawing() { zm_canvas.reset(); }

    TRGBA PixelAt(std::int32_t x, std::int32_t y);
    /// Red, green, blue of a pixel as 0xRRGGBB.
    std::uint32_t ColorAt(std::int32_t x, std::int32_t y);
    /// Sum of the alpha bytes of a 32-bit picture, in whole pixels.
    double CoveredArea();
    /// Whether no alpha byte lies between 0 and 255.
    bool IsAllOrNothing();
    /// Bounds of the pixels that are not all zero; empty when there are none.
    TRect InkBounds();

    TBitmap bitmap;
    TCanvas canvas{bitmap};
    std::unique_ptr<TZmCanvas> zm_canvas;
};

/// Whether the system's library draws the edges of shapes with partial coverage. Where it does
/// not, areas are those of whole pixels.
bool ShapesHaveCoverage();

inline constexpr TColor kRed = 0x0000FF;
inline constexpr TColor kBlue = 0xFF0000;

}  // namespace zm::test
