#pragma once

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>

#include "engine/foundation/zmnumbers.h"
#include "engine/proc/zmrotate_p.h"

/// What the engines that map target pixels back to the source share: runs of columns by where
/// their source lies, and the pixel formulas of the inverse filter.
namespace zm {

/// Nearest integer, ties to even, of a value from -1/2 to 2^31 - 1: the sum drops the fraction
/// by the processor's own rounding.
inline std::int32_t RoundInside(double value) {
    constexpr double kUnit = 6755399441055744.0;  // 1.5 * 2^52, where doubles are integers
    return static_cast<std::int32_t>(value + kUnit - kUnit);
}

/// The columns of `span` whose position, base[x] + offset after `change`, lies from `low` to
/// below `high`. Positions rise or fall all along a row, rounding included, so that these columns
/// are one run.
template <typename Change>
TColumnSpan RestrictSpan(TColumnSpan span, const double* base, double offset, double low,
                         double high, const Change& change) {
    if (span.IsEmpty()) {
        return span;
    }
    const double* const begin = base + span.begin;
    const double* const end = base + span.end;
    const bool is_rising = *begin <= end[-1];
    const auto lies_before = [&](double value) {
        const double position = change(value + offset);
        return is_rising ? position < low : position >= high;
    };
    const auto lies_before_end = [&](double value) {
        const double position = change(value + offset);
        return is_rising ? position < high : position >= low;
    };
    const double* const first = std::partition_point(begin, end, lies_before);
    const double* const last = std::partition_point(first, end, lies_before_end);
    return {static_cast<std::int32_t>(first - base), static_cast<std::int32_t>(last - base)};
}

/// Bounds of source positions, the upper ones exclusive.
struct TPositionBounds {
    double left = 0;
    double right = 0;
    double top = 0;
    double bottom = 0;
};

/// The columns of `span` in a target row whose source lies inside `bounds`.
template <typename Change>
TColumnSpan FindSpan(const TRotationMap& map, TRotationMap::TRow row, TColumnSpan span,
                     const TPositionBounds& bounds, const Change& change) {
    span = RestrictSpan(span, map.A(), -row.p, bounds.left, bounds.right, change);
    return RestrictSpan(span, map.B(), row.q, bounds.top, bounds.bottom, change);
}

/// Makes the rows ready that the columns of a run (not empty) read, `above` and `below` the one
/// that each falls on.
inline void RequireRowsOf(TSourceRows& rows, const TRotationMap& map, TRotationMap::TRow row,
                          TColumnSpan span, std::int32_t above, std::int32_t below,
                          std::int32_t height) {
    if (rows.IsDirect()) {
        return;
    }
    const double one = map.SourceY(span.begin, row);
    const double other = map.SourceY(span.end - 1, row);
    const double first = std::floor(std::min(one, other)) - above;
    const double last = std::floor(std::max(one, other)) + below;
    rows.Require(std::max(TruncToInt(first), 0), std::min(TruncToInt(last), height - 1));
}

/// Target columns to work on at a time, so that their rows can all be ready.
inline std::int32_t TileColumns(const TSourceRows& rows, const TRotationMap& map,
                                std::int32_t target_width) {
    constexpr double kRowsBesides = 8;
    if (rows.IsDirect() || map.RowsPerColumn() * target_width + kRowsBesides < rows.Capacity()) {
        return target_width;
    }
    const double columns = (rows.Capacity() - kRowsBesides) / map.RowsPerColumn();
    return std::clamp(TruncToInt(columns), 1, target_width);
}

template <std::size_t kChannels>
using TTap = std::array<std::uint8_t, kChannels>;

/// A pixel of the inverse filter between four taps. `read(i, j)` gives the tap of a whole
/// position, the background outside the image.
template <std::size_t kChannels, typename Reader>
void BilinearPixel(const Reader& read, double source_x, double source_y, std::uint8_t* out) {
    const double i = std::floor(source_x);
    const double j = std::floor(source_y);
    const double fx = source_x - i;
    const double fy = source_y - j;
    const TTap<kChannels> p00 = read(i, j);
    const TTap<kChannels> p10 = read(i + 1, j);
    const TTap<kChannels> p01 = read(i, j + 1);
    const TTap<kChannels> p11 = read(i + 1, j + 1);
    for (std::size_t c = 0; c < kChannels; ++c) {
        const double top = p00[c] + (p10[c] - p00[c]) * fx;
        const double bottom = p01[c] + (p11[c] - p01[c]) * fx;
        out[c] = Clamp8(TruncToInt((bottom - top) * fy + top));
    }
}

/// Weights of the four taps around a fraction t, from the second before it on.
inline std::array<double, 4> BicubicWeights(double t) {
    return {-t * (1 - t) * (1 - t), 1 - 2 * t * t + t * t * t, (1 + t - t * t) * t,
            t * t * (t - 1)};
}

/// The same from sixteen taps.
template <std::size_t kChannels, typename Reader>
void BicubicPixel(const Reader& read, double source_x, double source_y, std::uint8_t* out) {
    const double i = std::floor(source_x);
    const double j = std::floor(source_y);
    const std::array<double, 4> column_weights = BicubicWeights(source_x - i);
    const std::array<double, 4> row_weights = BicubicWeights(source_y - j);
    std::array<double, kChannels> sums{};
    for (int row = 0; row < 4; ++row) {
        std::array<double, kChannels> row_sums{};
        for (int column = 0; column < 4; ++column) {
            const TTap<kChannels> tap = read(i + (column - 1), j + (row - 1));
            for (std::size_t c = 0; c < kChannels; ++c) {
                row_sums[c] += column_weights[static_cast<std::size_t>(column)] * tap[c];
            }
        }
        for (std::size_t c = 0; c < kChannels; ++c) {
            sums[c] += row_weights[static_cast<std::size_t>(row)] * row_sums[c];
        }
    }
    for (std::size_t c = 0; c < kChannels; ++c) {
        out[c] = Clamp8(RoundHalfEven(sums[c]));
    }
}

/// Makes the target of the inverse filter in a format that it works in.
[[nodiscard]] bool AllocateInverseTarget(TZmBitmap& source, TZmBitmap& target, double angle);

}  // namespace zm
