#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "engine/bitmap/zmbasebitmap.h"
#include "engine/platform/dibsection.h"

namespace zm {

class TBitmap;

/// A bitmap in a device-independent section, usable in the system's drawing calls. It holds black
/// and white (1 bit a pixel) or colours (24), and 8 bits for greys. Rows are aligned to 32 bits,
/// bottom row first in memory; row 0 is the top row. Pixels are 0 after allocation.
///
/// The palette follows from the depth and cannot be changed: black and white, a grey ramp, or
/// none.
///
/// TZmBitmap has CopyFromTDibBitmap (makes itself the same picture: zm1g, zm8g or zm24RGB),
/// CopyToTDibBitmap (makes this one a rectangle of the image at the image's depth, 0 where the
/// rectangle leaves it; False for other depths than these), and MergeFromTDibBitmap (copies the
/// picture to x, y of the image, clipped).
class TZmDibbitmap : public TZmBaseBitmap {
public:
    TZmDibbitmap();
    ~TZmDibbitmap() override;

    /// Makes room for 1, 8 or 24 bits a pixel. False, and size 0, for other depths, sizes below 1
    /// and without room. The old pixels are gone in any case.
    bool AllocateBits(std::int32_t BmpWidth, std::int32_t BmpHeight, std::int32_t BmpBitCount);
    void FreeBits();
    /// Makes `Dest` the same picture; empty without room, or when this one is empty.
    void CopyToTBitmap(TBitmap* Dest);
    /// The device context that holds the section, and the section's handle, for drawing calls;
    /// nil on systems without them.
    void* GetHDC() const;
    void* GetDIB() const;
    /// The first byte of the bottom row, nil when empty.
    std::uint8_t* GetBits();

    std::uint8_t* GetScanLine(std::int32_t row) override;
    std::int32_t GetBitCount() override { return fBitCount; }
    std::int32_t GetHeight() override { return fHeight; }
    std::int32_t GetWidth() override { return fWidth; }
    /// Raise EZmException: "Cannot resize TZmDibBitmap".
    void SetWidth(std::int32_t width) override;
    void SetHeight(std::int32_t height) override;
    /// By depth: zm1g, zm8g, zm24RGB, or zmnull when empty.
    TZmPixelFormat GetPixelFormat() override;
    std::int64_t GetRowLen() override { return fRowLen; }
    const std::vector<TRGB>& GetPaletteArray() override { return palette_; }
    TRGB GetPalette(std::int32_t index) override;
    void SetPalette(std::int32_t, TRGB) override {}
    std::int32_t GetPaletteLen() override;
    std::int32_t GetPaletteUsed() override { return GetPaletteLen(); }
    void SetPaletteUsed(std::int32_t) override {}
    /// zm1g and zm24RGB; other formats are not available and give False.
    bool Allocate(std::int32_t width, std::int32_t height, TZmPixelFormat format) override;
    /// As zm24RGB filled with the colour. There is no alpha plane: `alpha` is not used.
    bool Allocate(std::int32_t width, std::int32_t height, TColor fill_color,
                  std::int32_t alpha) override;
    /// Copies the pixels of zm1g, zm8g and zm24RGB; other formats leave this bitmap empty.
    void Assign(TZmBaseBitmap* source) override;
    void AssignImage(TZmBaseBitmap* source) override { Assign(source); }
    void CopyPaletteTo(TZmBaseBitmap* dest) override;

private:
    std::int32_t fWidth = 0;
    std::int32_t fHeight = 0;
    std::int32_t fBitCount = 0;
    std::uint32_t fRowLen = 0;
    std::unique_ptr<platform::TDibSection> section_;
    std::uint8_t* fBits = nullptr;
    std::vector<TRGB> palette_;
};

}  // namespace zm
