#pragma once

#include <cstdint>
#include <vector>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// A selection mask of 1 or 8 bits per pixel; also how codecs hand alpha to the driver. Rows run
/// bottom-up and are aligned to 32 bits; a 1-bit mask has bit 7 - (x mod 8) of byte x / 8.
///
/// The bounding rectangle holds the pixels that were ever set to non-zero; an empty one has its
/// left above its right. Not thread-safe.
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
    void Assign(TZmMask& source);
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

    std::int32_t fWidth = 0;
    std::int32_t fHeight = 0;
    std::int32_t fBitsperpixel = 0;
    std::int64_t fRowlen = 0;
    std::vector<std::uint8_t> fBits;
    std::int32_t fX1 = 2147483647;
    std::int32_t fY1 = 2147483647;
    std::int32_t fX2 = 0;
    std::int32_t fY2 = 0;
    bool fFull = false;
};

}  // namespace zm
