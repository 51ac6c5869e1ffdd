#pragma once

#include <cstdint>
#include <memory>
#include <span>

#include "engine/foundation/zmdefs.h"

namespace zm {

class TBitmap;
class TZmBitmap;

/// Where and how the outline of a mask is shown on a canvas.
struct TZmMaskView {
    std::int32_t left = 0;  ///< canvas position of the mask's corner
    std::int32_t top = 0;
    double zoom = 1.0;       ///< canvas pixels a mask pixel
    std::int32_t phase = 0;  ///< shift of the dashes in pixels; a timer that counts it animates
};

/// Gives the rows of a mask back to the heap of the bitmaps.
struct TZmMaskBitsDeleter {
    std::int64_t size_bytes = 0;
    void operator()(std::uint8_t* bits) const;
};

/// A selection mask of 1 or 8 bits per pixel; also how codecs hand alpha to the driver. Rows run
/// bottom-up and are aligned to 32 bits; a 1-bit mask has bit 7 - (x mod 8) of byte x / 8.
///
/// The bounding rectangle holds the pixels that were ever set to non-zero; an empty one has its
/// left above its right. Rectangles are inclusive, and whatever lies outside the mask is cut off.
/// Values go from 0, outside the selection, to 255, inside it; in 1-bit masks any value but 0
/// sets the bit, which counts as 255 where pixels are blended. Not thread-safe.
class TZmMask {
public:
    TZmMask() = default;
    TZmMask(const TZmMask&) = delete;
    TZmMask& operator=(const TZmMask&) = delete;

    /// Takes a size and a depth (1 or 8) and drops the old rows. The new rows come zeroed at the
    /// first use. False when the size is below 1, too large, or the depth another.
    [[nodiscard]] bool AllocateBits(std::int32_t width, std::int32_t height,
                                    std::int32_t bits_per_pixel);
    void FreeBits();
    /// Address of row `row`, 0 at the top; nil for a row outside or without memory.
    std::uint8_t* GetScanLine(std::int32_t row);
    /// Sets a pixel; coordinates outside are ignored. Non-zero values grow the rectangle.
    void SetPixel(std::int32_t x, std::int32_t y, std::int32_t alpha);
    /// Value of a pixel (0 or 1 in a 1-bit mask); 0 outside.
    std::int32_t GetPixel(std::int32_t x, std::int32_t y);
    /// Sets every pixel to a value and the rectangle to all or to empty.
    void Fill(std::int32_t alpha);
    /// Clears all pixels and the rectangle.
    void Empty();
    bool IsEmpty() const { return fX1 > fX2; }
    bool IsPointInside(std::int32_t x, std::int32_t y) { return GetPixel(x, y) != 0; }
    /// Without room the mask is without size afterwards.
    void Assign(TZmMask& source);

    // Shapes: set the pixels of a shape to a value and leave the others.
    void SetRectangle(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                      std::int32_t alpha);
    /// The pixels whose centres lie in the ellipse of a rectangle of Width x Height pixels that
    /// starts Width / 2 to the left of CenterX and Height / 2 above CenterY (halves truncated).
    void SetEllipse(std::int32_t CenterX, std::int32_t CenterY, std::int32_t Width,
                    std::int32_t Height, std::int32_t Alpha);
    /// A closed polygon with its corners at pixel centres: the pixels on its edges, and those
    /// inside by the even-odd rule.
    void DrawPolygon(std::span<const TPoint> points, std::int32_t alpha);

    // Changes of the whole. Rectangle and fFull are brought up to date.
    /// v becomes MaxVal - v, not below 0; in a 1-bit mask bits turn over.
    void Negative(std::int32_t MaxVal);
    /// Clears what lies outside the given rectangle.
    void Intersect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2);
    /// Moves the selection. With CutSel what leaves the mask is lost; otherwise the move ends
    /// where the bounding rectangle meets the border. Without room nothing happens.
    void TranslateBitmap(std::int32_t ox, std::int32_t oy, bool CutSel);
    /// Changes the size; pixels that both sizes have stay, new ones are 0. False, and the mask as
    /// it was, when there is no such mask or no room.
    bool Resize(std::int32_t NewWidth, std::int32_t NewHeight);
    /// A mask of the same depth and another size, by nearest neighbour: column x comes from
    /// Trunc(x * width / NewWidth), rows alike. Nil when there is no such mask or no room.
    std::unique_ptr<TZmMask> CreateResampledMask(std::int32_t NewWidth, std::int32_t NewHeight);

    // Pixels through the mask.
    /// Writes `source`, whose corner lies at (left, top) of the image and mask, into `dest`: a
    /// mask value of 0 leaves the pixel, 255 takes the source's, those between mix the channels,
    /// rounded to the nearest. Bits are taken from the value 128 on. Palette colours are mixed as
    /// RGB, and so are images of different formats. To write back a copy of the bounding
    /// rectangle, pass GetX1 and GetY1. The mark of a full plane is taken off `dest`.
    void CopyZmBitmap(TZmBitmap* dest, TZmBitmap* source, std::int32_t left, std::int32_t top);
    /// The same between the alpha planes; `dest` gets one when needed. A source without a plane
    /// leaves everything.
    void CopyZmBitmapAlpha(TZmBitmap* dest, TZmBitmap* source, std::int32_t left, std::int32_t top);
    /// The same between platform bitmaps.
    void CopyBitmap(TBitmap* dest, TBitmap* source, std::int32_t left, std::int32_t top);
    /// Lowers the mask to the values of a plane of 8 bits a pixel (zm8g, zm8p; others do nothing)
    /// whose corner lies at (ox, oy) of the mask. A bit goes out where the plane is 0; pixels
    /// beyond the plane stay. The rectangle follows when asked.
    void CombineWithAlpha(TZmBitmap* SourceAlpha, std::int32_t ox, std::int32_t oy,
                          bool SynchronizeBoundingRect);

    // Outlines. Pixels of the zoomed mask count as set when their value is not 0.
    /// Black and white dashes of four pixels on the set pixels at the border of the set area.
    void DrawOutline(TBitmap* canvas, const TZmMaskView& view);
    /// The same on the clear pixels that touch the set area.
    void DrawOuter(TBitmap* canvas, const TZmMaskView& view);
    /// Inverts the colours under the white dashes of DrawOutline; on canvases of 24 and 32 bits
    /// a second call restores the picture.
    void InvertCanvas(TBitmap* canvas, const TZmMaskView& view);

    /// Recomputes fFull: no pixel below 255 (8 bits), no clear pixel (1 bit).
    void SyncFull();
    /// Recomputes the bounding rectangle from the pixels.
    void SyncRect();

    std::int32_t GetWidth() const { return fWidth; }
    std::int32_t GetHeight() const { return fHeight; }
    std::int32_t GetBitsPerPixel() const { return fBitsperpixel; }
    std::int64_t GetRowLen() const { return fRowlen; }
    bool GetFull() const { return fFull; }
    void SetFull(bool full) { fFull = full; }
    /// Bounding rectangle, inclusive.
    std::int32_t GetX1() const { return fX1; }
    std::int32_t GetY1() const { return fY1; }
    std::int32_t GetX2() const { return fX2; }
    std::int32_t GetY2() const { return fY2; }

private:
    void ResetRect();
    std::size_t BitsSize() const { return static_cast<std::size_t>(fRowlen * fHeight); }
    void WriteRun(std::int32_t y, std::int64_t x1, std::int64_t x2, std::int32_t alpha);
    bool MoveTo(TZmMask& dest, std::int32_t ox, std::int32_t oy);
    void TakeOver(TZmMask& source);

    std::int32_t fWidth = 0;
    std::int32_t fHeight = 0;
    std::int32_t fBitsperpixel = 0;
    std::int64_t fRowlen = 0;
    std::unique_ptr<std::uint8_t[], TZmMaskBitsDeleter> fBits;
    std::int32_t fX1 = 2147483647;
    std::int32_t fY1 = 2147483647;
    std::int32_t fX2 = 0;
    std::int32_t fY2 = 0;
    bool fFull = false;
};

}  // namespace zm
