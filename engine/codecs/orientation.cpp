// Pictures that lie in their file turned or mirrored, brought upright. Pixels are moved, never
// mixed, so the result is exact. Rows are taken in strips, since only one row of a bitmap in a
// file can be reached at a time and a column of pixels touches every row.

#include "engine/codecs/orientation.h"

#include <algorithm>
#include <cstring>
#include <vector>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/accessscope_p.h"
#include "engine/foundation/zmassert.h"
#include "engine/metadata/zmexiforientation.h"

namespace zm {

namespace {

constexpr std::int32_t kStripRows = 32;

/// What becomes of a pixel at x, y: sides swapped or not, then each axis of the source as it runs
/// or from its far end.
struct TTurn {
    bool swaps_sides;
    bool reverses_x;
    bool reverses_y;
};

constexpr TTurn kTurns[] = {
    {false, false, false}, {false, true, false}, {false, true, true}, {false, false, true},
    {true, false, false},  {true, false, true},  {true, true, true},  {true, true, false},
};

template <std::size_t kBytes>
void ReverseRow(const std::uint8_t* source, std::uint8_t* target, std::int32_t width) {
    target += static_cast<std::size_t>(width) * kBytes;
    for (std::int32_t x = 0; x < width; ++x) {
        target -= kBytes;
        std::memcpy(target, source, kBytes);
        source += kBytes;
    }
}

template <std::size_t kBytes>
bool MirrorRows(TZmBitmap& source, TZmBitmap& target, TTurn turn) {
    const std::int32_t width = source.GetWidth();
    const std::int32_t height = source.GetHeight();
    for (std::int32_t y = 0; y < height; ++y) {
        const std::uint8_t* from = source.GetScanLine(y);
        std::uint8_t* to = target.GetScanLine(turn.reverses_y ? height - 1 - y : y);
        if (from == nullptr || to == nullptr) {
            return false;
        }
        if (turn.reverses_x) {
            ReverseRow<kBytes>(from, to, width);
        } else {
            std::memcpy(to, from, static_cast<std::size_t>(width) * kBytes);
        }
    }
    return true;
}

/// Rows `first` to `first + count - 1` of the source, in the order of the target's columns.
bool FillStrip(TZmBitmap& source, std::int32_t first, std::int32_t count, bool reversed,
               std::size_t row_bytes, std::uint8_t* strip) {
    for (std::int32_t i = 0; i < count; ++i) {
        const std::uint8_t* row = source.GetScanLine(reversed ? first + count - 1 - i : first + i);
        if (row == nullptr) {
            return false;
        }
        std::memcpy(strip + static_cast<std::size_t>(i) * row_bytes, row, row_bytes);
    }
    return true;
}

template <std::size_t kBytes>
bool SwapSides(TZmBitmap& source, TZmBitmap& target, TTurn turn) {
    const std::int32_t width = source.GetWidth();
    const std::int32_t height = source.GetHeight();
    const std::size_t row_bytes = static_cast<std::size_t>(width) * kBytes;
    std::vector<std::uint8_t> strip(row_bytes * kStripRows);
    for (std::int32_t first = 0; first < height; first += kStripRows) {
        const std::int32_t count = std::min(kStripRows, height - first);
        if (!FillStrip(source, first, count, turn.reverses_y, row_bytes, strip.data())) {
            return false;
        }
        const std::int32_t column = turn.reverses_y ? height - first - count : first;
        for (std::int32_t x = 0; x < width; ++x) {
            std::uint8_t* to = target.GetScanLine(turn.reverses_x ? width - 1 - x : x);
            if (to == nullptr) {
                return false;
            }
            to += static_cast<std::size_t>(column) * kBytes;
            const std::uint8_t* from = strip.data() + static_cast<std::size_t>(x) * kBytes;
            for (std::int32_t i = 0; i < count; ++i, to += kBytes, from += row_bytes) {
                std::memcpy(to, from, kBytes);
            }
        }
    }
    return true;
}

template <std::size_t kBytes>
bool TurnPixels(TZmBitmap& source, TZmBitmap& target, TTurn turn) {
    return turn.swaps_sides ? SwapSides<kBytes>(source, target, turn)
                            : MirrorRows<kBytes>(source, target, turn);
}

bool TurnInto(TZmBitmap& source, TZmBitmap& target, TTurn turn) {
    const TAccessScope source_scope(source, zmdRead);
    const TAccessScope target_scope(target, zmdReadWrite);
    switch (source.GetBitCount()) {
        case 8: return TurnPixels<1>(source, target, turn);
        case 24: return TurnPixels<3>(source, target, turn);
        case 32: return TurnPixels<4>(source, target, turn);
        default: ZM_ASSERT(false); return false;
    }
}

}  // namespace

bool TurnUpright(TZmBitmap& bitmap, std::int32_t orientation) {
    if (orientation <= kOrientationUpright || orientation > kOrientationLast) {
        return true;
    }
    const TTurn turn = kTurns[orientation - 1];
    const std::int32_t width = turn.swaps_sides ? bitmap.GetHeight() : bitmap.GetWidth();
    const std::int32_t height = turn.swaps_sides ? bitmap.GetWidth() : bitmap.GetHeight();
    TZmBitmap upright;
    if (bitmap.GetLocation() != zmTBitmap) {
        upright.SetLocation(bitmap.GetLocation());
    }
    upright.SetMinFileSize(bitmap.GetMinFileSize());
    upright.SetBitAlignment(bitmap.GetBitAlignment());
    upright.SetMemoryAllocator(bitmap.GetMemoryAllocator());
    if (!upright.Allocate(width, height, bitmap.GetPixelFormat()) ||
        !TurnInto(bitmap, upright, turn)) {
        return false;
    }
    bitmap.TakeOver(upright);
    return !bitmap.IsEmpty();  // a platform bitmap takes a copy, for which room may lack
}

}  // namespace zm
