/// Fills: one pixel is made from the value, rows are its repetition.

#include <algorithm>
#include <array>
#include <cstring>
#include <vector>

#include "engine/bitmap/zmbitrow_p.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// The bytes of one pixel; for zm1g the first byte is not 0 when bits are to be set.
struct TPixelPattern {
    std::array<std::uint8_t, 8> bytes{};
    std::size_t size = 1;

    bool HasEqualBytes() const {
        return std::all_of(bytes.begin(), bytes.begin() + static_cast<std::ptrdiff_t>(size),
                           [this](std::uint8_t byte) { return byte == bytes[0]; });
    }
};

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
    const bool is_one_bit = bitmap.GetPixelFormat() == zm1g;
    const bool is_one_byte = !is_one_bit && pattern.HasEqualBytes();
    const std::size_t offset = static_cast<std::size_t>(rect.left) * pattern.size;
    const std::size_t count = static_cast<std::size_t>(width) * pattern.size;
    // Whole rows take the unused bits of their last byte along.
    const std::int64_t bit_count = is_whole_rows ? (std::int64_t{width} + 7) / 8 * 8 : width;
    std::vector<std::uint8_t> row;
    if (!is_one_bit && !is_one_byte) {
        row = MakePatternRow(pattern, static_cast<std::size_t>(width));
    }
    for (std::int32_t y = rect.top; y <= rect.bottom; ++y) {
        std::uint8_t* const line = bitmap.GetScanLine(y);
        if (is_one_bit) {
            FillBits(line, rect.left, bit_count, pattern.bytes[0] != 0);
        } else if (is_one_byte) {
            std::memset(line + offset, pattern.bytes[0], count);
        } else {
            std::memcpy(line + offset, row.data(), count);
        }
    }
}

}  // namespace

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
