#include <cstddef>
#include <cstdint>
#include <cstring>

#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/colorcopy_p.h"

namespace zm {

bool CopyColors(TZmBitmap& source, TZmBitmap& copy) {
    if (!copy.Allocate(source.GetWidth(), source.GetHeight(), zm24RGB)) {
        return false;
    }
    TZmRgbRows rows(source);
    const std::size_t row_bytes = static_cast<std::size_t>(source.GetWidth()) * sizeof(TRGB);
    for (std::int32_t y = 0; y < source.GetHeight(); ++y) {
        const TRGB* from = rows.GetRow(y);
        std::uint8_t* to = copy.GetScanLine(y);
        if (from == nullptr || to == nullptr) {
            return false;
        }
        std::memcpy(to, from, row_bytes);
    }
    return true;
}

}  // namespace zm
