// 1-bit sources resampled to zm24RGB greys: linear interpolation with 17 fractional bits, or,
// when both sides shrink, the share of set bits in the footprint.

#include <algorithm>
#include <array>
#include <vector>

#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

constexpr std::int32_t kFractionBits = 17;

std::int32_t BitSample(const std::uint8_t* row, std::int32_t x) {
    return (row[x >> 3] >> (7 - (x & 7)) & 1) != 0 ? 255 : 0;
}

std::int32_t Blend(std::int32_t a, std::int32_t b, std::int32_t fraction_q17) {
    return a + (((b - a) * fraction_q17) >> kFractionBits);
}

/// A position along an axis: the sample before it and the way to the next.
struct TPosition {
    std::int32_t index = 0;
    std::int32_t next = 0;
    std::int32_t fraction_q17 = 0;
};

TPosition PositionOf(std::int32_t target_index, double scale, std::int32_t source_size) {
    const double exact = target_index / scale;
    TPosition position;
    position.index = std::min(TruncToInt(exact), source_size - 1);
    position.next = std::min(position.index + 1, source_size - 1);
    position.fraction_q17 = TruncToInt((exact - position.index) * (1 << kFractionBits));
    return position;
}

void WriteGrays(TZmBitmap& target, std::int32_t y, const std::vector<std::uint8_t>& grays) {
    std::uint8_t* out = target.GetScanLine(y);
    if (out == nullptr) {
        return;
    }
    for (const std::uint8_t gray : grays) {
        *out++ = gray;
        *out++ = gray;
        *out++ = gray;
    }
}

/// Source rows blended horizontally, made on demand; two are held.
class TBlendedRows {
public:
    TBlendedRows(TZmBitmap& source, std::int32_t target_width, double scale)
        : source_(source), positions_(MakeWorkBuffer<TPosition>(target_width)) {
        for (std::size_t x = 0; x < positions_.size(); ++x) {
            positions_[x] = PositionOf(static_cast<std::int32_t>(x), scale, source.GetWidth());
        }
        for (TRow& row : rows_) {
            row.grays = MakeWorkBuffer<std::uint8_t>(target_width);
        }
    }

    const std::vector<std::uint8_t>& Get(std::int32_t index) {
        for (const TRow& row : rows_) {
            if (row.index == index) {
                return row.grays;
            }
        }
        TRow& row = rows_[0].index < rows_[1].index ? rows_[0] : rows_[1];
        row.index = index;
        if (const std::uint8_t* bits = source_.GetScanLine(index); bits != nullptr) {
            for (std::size_t x = 0; x < positions_.size(); ++x) {
                const TPosition& at = positions_[x];
                row.grays[x] = Clamp8(
                    Blend(BitSample(bits, at.index), BitSample(bits, at.next), at.fraction_q17));
            }
        }
        return row.grays;
    }

private:
    struct TRow {
        std::int32_t index = -1;
        std::vector<std::uint8_t> grays;
    };

    TZmBitmap& source_;
    std::vector<TPosition> positions_;
    std::array<TRow, 2> rows_;
};

void BlendBits(TZmBitmap& source, TZmBitmap& target, double scale_x, double scale_y) {
    TBlendedRows rows(source, target.GetWidth(), scale_x);
    std::vector<std::uint8_t> grays = MakeWorkBuffer<std::uint8_t>(target.GetWidth());
    for (std::int32_t y = 0; y < target.GetHeight(); ++y) {
        const TPosition at = PositionOf(y, scale_y, source.GetHeight());
        const std::vector<std::uint8_t>& a = rows.Get(at.index);
        const std::vector<std::uint8_t>& b = rows.Get(at.next);
        for (std::size_t x = 0; x < grays.size(); ++x) {
            grays[x] = Clamp8(Blend(a[x], b[x], at.fraction_q17));
        }
        WriteGrays(target, y, grays);
    }
}

/// First and last source pixel of a footprint, inclusive and inside the image.
struct TFootprint {
    std::int32_t start = 0;
    std::int32_t end = 0;
};

TFootprint LimitFootprint(double start, double end, std::int32_t source_size) {
    return TFootprint{std::clamp(TruncToInt(start), 0, source_size - 1),
                      std::clamp(TruncToInt(end), 0, source_size - 1)};
}

/// set_bits[x]: set bits left of column x in the rows of a footprint.
void CountSetBits(TZmBitmap& source, TFootprint rows, std::vector<std::int64_t>& set_bits) {
    std::fill(set_bits.begin(), set_bits.end(), 0);
    for (std::int32_t y = rows.start; y <= rows.end; ++y) {
        const std::uint8_t* row = source.GetScanLine(y);
        if (row == nullptr) {
            continue;
        }
        for (std::size_t x = 0; x + 1 < set_bits.size(); ++x) {
            set_bits[x + 1] += row[x >> 3] >> (7 - (x & 7)) & 1;
        }
    }
    for (std::size_t x = 1; x < set_bits.size(); ++x) {
        set_bits[x] += set_bits[x - 1];
    }
}

}  // namespace

bool ReduceBits(TZmBitmap& source, TZmBitmap& target) {
    if (source.IsEmpty() || target.IsEmpty() || source.GetPixelFormat() != zm1g ||
        !FitTargetFormat(target, zm24RGB)) {
        return false;
    }
    const double rx = static_cast<double>(source.GetWidth()) / target.GetWidth();
    const double ry = static_cast<double>(source.GetHeight()) / target.GetHeight();
    std::vector<std::int64_t> set_bits =
        MakeWorkBuffer<std::int64_t>(static_cast<std::int64_t>(source.GetWidth()) + 1);
    std::vector<std::uint8_t> grays = MakeWorkBuffer<std::uint8_t>(target.GetWidth());
    for (std::int32_t y = 0; y < target.GetHeight(); ++y) {
        // The rows' end takes the whole part of the ratio, the columns' end the ratio itself.
        const TFootprint rows =
            LimitFootprint(y * ry - ry / 2, TruncToInt(ry) / 2.0 + y * ry, source.GetHeight());
        CountSetBits(source, rows, set_bits);
        for (std::size_t x = 0; x < grays.size(); ++x) {
            const auto position = static_cast<double>(x);
            const TFootprint columns =
                LimitFootprint(position * rx - rx / 2, rx / 2 + position * rx, source.GetWidth());
            const std::int64_t set = set_bits[static_cast<std::size_t>(columns.end) + 1] -
                                     set_bits[static_cast<std::size_t>(columns.start)];
            const std::int64_t counted =
                (static_cast<std::int64_t>(rows.end) - rows.start + 1) *
                (static_cast<std::int64_t>(columns.end) - columns.start + 1);
            grays[x] = static_cast<std::uint8_t>(set * 255 / counted);
        }
        WriteGrays(target, y, grays);
    }
    return true;
}

bool ResampleBitsFastLinear(TZmBitmap& source, TZmBitmap& target) {
    if (source.IsEmpty() || target.IsEmpty() || source.GetPixelFormat() != zm1g) {
        return false;
    }
    const double scale_x = static_cast<double>(target.GetWidth()) / source.GetWidth();
    const double scale_y = static_cast<double>(target.GetHeight()) / source.GetHeight();
    if (scale_x == 1 && scale_y == 1) {
        target.AssignEx(&source, /*with_params=*/false);
        return !target.IsEmpty();
    }
    if (scale_x < 1 && scale_y < 1) {
        return ReduceBits(source, target);
    }
    if (!FitTargetFormat(target, zm24RGB)) {
        return false;
    }
    BlendBits(source, target, scale_x, scale_y);
    return true;
}

}  // namespace zm
