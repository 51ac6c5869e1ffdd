#pragma once

#include <cstdint>
#include <vector>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// The abstract image: a size, a pixel format, rows and a palette. Row 0 is the top row.
class TZmBaseBitmap {
public:
    TZmBaseBitmap() = default;
    TZmBaseBitmap(const TZmBaseBitmap&) = delete;
    TZmBaseBitmap& operator=(const TZmBaseBitmap&) = delete;
    virtual ~TZmBaseBitmap() = default;

    /// Address of a row, valid until the next call on a file-backed image. The row number is not
    /// tested in release builds: 0 to height - 1 is the caller's duty.
    virtual std::uint8_t* GetScanLine(std::int32_t row) = 0;
    virtual std::int32_t GetBitCount() = 0;
    virtual std::int32_t GetHeight() = 0;
    virtual std::int32_t GetWidth() = 0;
    /// Changes a side, keeping the pixels that both sizes have; new pixels are not cleared.
    virtual void SetWidth(std::int32_t width) = 0;
    virtual void SetHeight(std::int32_t height) = 0;
    virtual TZmPixelFormat GetPixelFormat() = 0;
    /// Bytes per row, padding included.
    virtual std::int64_t GetRowLen() = 0;
    virtual const std::vector<TRGB>& GetPaletteArray() = 0;
    /// Entry of the palette; an index outside gives black.
    virtual TRGB GetPalette(std::int32_t index) = 0;
    /// Sets an entry; an index outside is ignored.
    virtual void SetPalette(std::int32_t index, TRGB value) = 0;
    virtual std::int32_t GetPaletteLen() = 0;
    virtual std::int32_t GetPaletteUsed() = 0;
    virtual void SetPaletteUsed(std::int32_t count) = 0;
    /// Makes room for pixels; they are not cleared. False, and size 0, when there is no room or
    /// the size or format is no image.
    virtual bool Allocate(std::int32_t width, std::int32_t height, TZmPixelFormat format) = 0;
    /// Allocates zm24RGB filled with a colour; alpha below 255 also fills the alpha plane.
    virtual bool Allocate(std::int32_t width, std::int32_t height, TColor fill_color,
                          std::int32_t alpha) = 0;
    /// Copies everything, file parameters included / the pixels and what describes them.
    virtual void Assign(TZmBaseBitmap* source) = 0;
    virtual void AssignImage(TZmBaseBitmap* source) = 0;
    virtual void CopyPaletteTo(TZmBaseBitmap* dest) = 0;

    TZmDataAccess fAccess = zmdReadWrite;
};

}  // namespace zm
