#pragma once

#include <cstdint>
#include <vector>

#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmdefs.h"

namespace zm {

/// Rows of a bitmap of any format as TRGB, for readers that care about colours only (writers of
/// files, palette finders). The bitmap is neither changed nor copied; it must live longer than
/// this object and keep its size and format.
class TZmRgbRows {
public:
    explicit TZmRgbRows(TZmBitmap& source);
    /// `GetWidth()` pixels of row `y`, valid until the next call. Nil when the row cannot be
    /// reached (a mapping failed).
    const TRGB* GetRow(std::int32_t y);
    /// One pixel; rows are asked for only when `y` changes.
    TRGB GetPixel(std::int32_t x, std::int32_t y);

private:
    TZmBitmap& source_;
    TZmPixelFormat format_;
    std::int32_t width_;
    TZmRowContext context_;
    TZmRowFunction convert_ = nullptr;
    std::vector<TRGB> converted_;
    const std::uint8_t* raw_row_ = nullptr;  // row raw_y_, for GetPixel
    std::int32_t raw_y_ = -1;
};

}  // namespace zm
