#pragma once

#include <cstdint>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"

namespace zm {

/// What drawing to a canvas asks of the canvas: block transfers of colours and the device's own
/// stretching and filling. Coordinates are the canvas's; what lies outside it is left out. A
/// device that fails draws nothing.
class TZmRenderCanvas {
public:
    virtual ~TZmRenderCanvas() = default;
    /// Fills `block` (zm24RGB) with the pixels from x, y on; those outside keep their values.
    virtual void ReadBlock(std::int32_t x, std::int32_t y, TZmBitmap& block) = 0;
    /// Writes a zm24RGB block at x, y.
    virtual void WriteBlock(std::int32_t x, std::int32_t y, TZmBitmap& block) = 0;
    /// Draws a whole image, without its alpha, into a rectangle, as the device scales pictures.
    virtual void StretchImage(const TRect& rect, TZmBitmap& image) = 0;
    virtual void FillRect(const TRect& rect, TColor color) = 0;
};

/// The canvas of a platform bitmap, which outlives it. Stretching takes the nearest pixel.
class TBitmapCanvas : public TZmRenderCanvas {
public:
    explicit TBitmapCanvas(TBitmap& bitmap);
    void ReadBlock(std::int32_t x, std::int32_t y, TZmBitmap& block) override;
    void WriteBlock(std::int32_t x, std::int32_t y, TZmBitmap& block) override;
    void StretchImage(const TRect& rect, TZmBitmap& image) override;
    void FillRect(const TRect& rect, TColor color) override;

private:
    TZmBitmap pixels_;  // the bitmap's own
};

}  // namespace zm
