/// Fills: one pixel is made from the value, rows are its repetition.

#include <algorithm>
#include <cstring>
#include <vector>

#include "engine/bitmap/zmbitrow_p.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmrowfiller_p.h"
#include "engine/bitmap/zmrunmover_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

bool HasEqualBytes(const TPixelPattern& pattern) {
    return std::all_of(pattern.bytes.begin(),
                       pattern.bytes.begin() + static_cast<std::ptrdiff_t>(pattern.size),
                       [&](std::uint8_t byte) { return byte == pattern.bytes[0]; });
}

template <typename T>
TPixelPattern PatternOf(const T& pixel) {
    static_assert(sizeof(T) <= 8);
    TPixelPattern pattern;
    pattern.size = sizeof(T);
    std::memcpy(pattern.bytes.data(), &pixel, sizeof(T));
    return pattern;
}

/// A colour in a format that the row conversions make from RGB.
TPixelPattern PatternOfColor(TRGB rgb, TZmPixelFormat format) {
    TPixelPattern pattern;
    pattern.size = static_cast<std::size_t>(PixelFormatInfo(format).bit_count) / 8;
    FindRowFunction(zm24RGB, format)(reinterpret_cast<const std::uint8_t*>(&rgb),
                                     pattern.bytes.data(), 1, TZmRowContext{});
    return pattern;
}

/// `count` pixels in a row, made by doubling.
std::vector<std::uint8_t> MakePatternRow(const TPixelPattern& pattern, std::size_t count) {
    std::vector<std::uint8_t> row(pattern.size * count);
    std::memcpy(row.data(), pattern.bytes.data(), pattern.size);
    for (std::size_t done = pattern.size; done < row.size();) {
        const std::size_t step = std::min(done, row.size() - done);
        std::memcpy(row.data() + done, row.data(), step);
        done += step;
    }
    return row;
}

/// Rows that are about to be overwritten whole need not be read from a file first.
class TWriteOnlyAccess {
public:
    TWriteOnlyAccess(TZmDataAccess& access, bool is_whole_rows) : access_(access), saved_(access) {
        access_ = is_whole_rows ? zmdWrite : access;
    }
    ~TWriteOnlyAccess() { access_ = saved_; }
    TWriteOnlyAccess(const TWriteOnlyAccess&) = delete;
    TWriteOnlyAccess& operator=(const TWriteOnlyAccess&) = delete;

private:
    TZmDataAccess& access_;
    TZmDataAccess saved_;
};

/// Fills an inclusive rectangle that lies inside the bitmap.
void FillRows(TZmBitmap& bitmap, const TRect& rect, const TPixelPattern& pattern) {
    const std::int32_t width = rect.right - rect.left + 1;
    const bool is_whole_rows = width == bitmap.GetWidth();
    const TRowFiller filler(bitmap.GetPixelFormat(), pattern, width);
    // Whole rows of bits take the unused ones of their last byte along.
    const bool takes_rest = bitmap.GetPixelFormat() == zm1g && is_whole_rows;
    const std::int64_t count = takes_rest ? (std::int64_t{width} + 7) / 8 * 8 : width;
    const bool is_upward = IsStoredBottomUp(bitmap);
    for (std::int32_t i = 0; i <= rect.bottom - rect.top; ++i) {
        const std::int32_t y = is_upward ? rect.bottom - i : rect.top + i;
        filler.Fill(bitmap.GetScanLine(y), rect.left, count);
    }
}

}  // namespace

TPixelPattern MakePattern(TZmPixelFormat format, double value) {
    const std::int32_t integer = TruncToInt(value);
    switch (format) {
        case zm1g: return PatternOf(static_cast<std::uint8_t>(value != 0 ? 255 : 0));
        case zm16g: return PatternOf(static_cast<std::uint16_t>(integer));
        case zm24RGB: return PatternOf(RGBFromColor(integer));
        case zm32f: return PatternOf(static_cast<float>(value));
        case zmCMYK:
        case zm48RGB:
        case zmCIELab:
        case zm32RGB: return PatternOfColor(RGBFromColor(integer), format);
        default: return PatternOf(static_cast<std::uint8_t>(integer));
    }
}

TRowFiller::TRowFiller(TZmPixelFormat format, const TPixelPattern& pattern,
                       std::int32_t longest_run)
    : pattern_(pattern), is_one_bit_(format == zm1g) {
    if (!is_one_bit_ && !HasEqualBytes(pattern) && longest_run > 0) {
        run_ = MakePatternRow(pattern, static_cast<std::size_t>(longest_run));
    }
}

void TRowFiller::Fill(std::uint8_t* row, std::int32_t x, std::int64_t count) const {
    if (count < 1) {
        return;
    }
    if (is_one_bit_) {
        FillBits(row, x, count, pattern_.bytes[0] != 0);
        return;
    }
    std::uint8_t* const first = row + static_cast<std::size_t>(x) * pattern_.size;
    const std::size_t bytes = static_cast<std::size_t>(count) * pattern_.size;
    if (run_.empty()) {
        std::memset(first, pattern_.bytes[0], bytes);
    } else {
        std::memcpy(first, run_.data(), bytes);
    }
}

void TZmBitmap::Fill(double value) {
    FillRect(0, 0, GetWidth() - 1, fHeight - 1, value);
}

void TZmBitmap::Fill(TRGBA value) {
    if (GetPixelFormat() != zm32RGB) {
        Fill(static_cast<double>(ColorFromRGB(TRGB{value.b, value.g, value.r})));
        return;
    }
    if (!IsEmpty() && !fIsVirtual) {
        const TWriteOnlyAccess write_only(fAccess, /*is_whole_rows=*/true);
        FillRows(*this, TRect{0, 0, fWidth - 1, fHeight - 1}, PatternOf(value));
    }
}

void TZmBitmap::FillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                         double value) {
    if (IsEmpty() || fIsVirtual) {
        return;
    }
    const TRect rect{std::max(x1, 0), std::max(y1, 0), std::min(x2, fWidth - 1),
                     std::min(y2, fHeight - 1)};
    if (rect.left > rect.right || rect.top > rect.bottom) {
        return;
    }
    const TPixelPattern pattern = MakePattern(fPixelFormat, value);
    const TWriteOnlyAccess write_only(fAccess, rect.left == 0 && rect.right == fWidth - 1);
    FillRows(*this, rect, pattern);
    // The mark of an all-opaque plane must not outlive a lower value.
    fFull = fFull && pattern.bytes[0] == 255;
}

}  // namespace zm
