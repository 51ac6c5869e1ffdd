/// The vector parts of rotation and flips: the inverse filter in the stated double arithmetic, the
/// channels of a pixel side by side; the mixing of sheared lines; three-byte pixels turned and
/// reversed.

#include "engine/proc/zmrotate_p.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "engine/proc/zmrotate_vectors.cpp"
#include <hwy/cache_control.h>
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace zm::HWY_NAMESPACE {

#if HWY_TARGET == HWY_SCALAR

// A processor without vectors: the plain loops do all.

std::int32_t ReverseBlocks(const std::uint8_t*, std::int32_t, std::uint8_t*) {
    return 0;
}

std::int32_t BlendBlocks(const std::uint8_t*, const std::uint8_t*, const std::int16_t*,
                         std::int16_t, std::uint8_t*, std::int32_t) {
    return 0;
}

std::int32_t BilinearRun(const TRotationRun&) {
    return 0;
}

std::int32_t BicubicRun(const TRotationRun&) {
    return 0;
}

std::int32_t TurnColumns(const std::uint8_t* const*, std::int32_t, std::size_t,
                         std::uint8_t* const*) {
    return 0;
}

#else

namespace hn = hwy::HWY_NAMESPACE;

using TBytes = hn::FixedTag<std::uint8_t, 16>;
using TFourBytes = hn::FixedTag<std::uint8_t, 4>;
using TInts = hn::FixedTag<std::int32_t, 4>;

/// Four doubles, the channels of a pixel or the positions of four: one vector where the processor
/// has them that wide, else two.
#if HWY_MAX_BYTES >= 32

using TDoubles = hn::FixedTag<double, 4>;
using TFour = hn::Vec<TDoubles>;

HWY_INLINE TFour All(double value) {
    return hn::Set(TDoubles(), value);
}
HWY_INLINE TFour LoadFour(const double* values) {
    return hn::LoadU(TDoubles(), values);
}
HWY_INLINE void StoreFour(TFour values, double* out) {
    hn::StoreU(values, TDoubles(), out);
}
HWY_INLINE TFour ToDoubles(hn::Vec<TInts> values) {
    return hn::PromoteTo(TDoubles(), values);
}
HWY_INLINE hn::Vec<TInts> Truncate(TFour values) {
    return hn::DemoteTo(TInts(), values);
}
HWY_INLINE TFour AddFour(TFour a, TFour b) {
    return hn::Add(a, b);
}
HWY_INLINE TFour SubFour(TFour a, TFour b) {
    return hn::Sub(a, b);
}
HWY_INLINE TFour MulFour(TFour a, TFour b) {
    return hn::Mul(a, b);
}

#else

using TDoubles = hn::FixedTag<double, 2>;
using THalfInts = hn::FixedTag<std::int32_t, 2>;

struct TFour {
    hn::Vec<TDoubles> low;
    hn::Vec<TDoubles> high;
};

HWY_INLINE TFour All(double value) {
    return {hn::Set(TDoubles(), value), hn::Set(TDoubles(), value)};
}
HWY_INLINE TFour LoadFour(const double* values) {
    return {hn::LoadU(TDoubles(), values), hn::LoadU(TDoubles(), values + 2)};
}
HWY_INLINE void StoreFour(TFour values, double* out) {
    hn::StoreU(values.low, TDoubles(), out);
    hn::StoreU(values.high, TDoubles(), out + 2);
}
HWY_INLINE TFour ToDoubles(hn::Vec<TInts> values) {
    return {hn::PromoteTo(TDoubles(), hn::LowerHalf(THalfInts(), values)),
            hn::PromoteTo(TDoubles(), hn::UpperHalf(THalfInts(), values))};
}
HWY_INLINE hn::Vec<TInts> Truncate(TFour values) {
    return hn::Combine(TInts(), hn::DemoteTo(THalfInts(), values.high),
                       hn::DemoteTo(THalfInts(), values.low));
}
HWY_INLINE TFour AddFour(TFour a, TFour b) {
    return {hn::Add(a.low, b.low), hn::Add(a.high, b.high)};
}
HWY_INLINE TFour SubFour(TFour a, TFour b) {
    return {hn::Sub(a.low, b.low), hn::Sub(a.high, b.high)};
}
HWY_INLINE TFour MulFour(TFour a, TFour b) {
    return {hn::Mul(a.low, b.low), hn::Mul(a.high, b.high)};
}

#endif

/// A pixel, and how far the next one is from it.
struct TTaps {
    TFour value;
    TFour step;
};

#if HWY_MAX_BYTES >= 32

using TSpreadBytes = hn::FixedTag<std::uint8_t, 32>;
using TSpreadWords = hn::FixedTag<std::uint64_t, 4>;

constexpr std::uint8_t kNo = 0x80;
/// Byte k of eight, which both halves of a vector hold, to the lowest of 64 bits.
HWY_ALIGN constexpr std::uint8_t kSpreadFirst[32] = {
    0, kNo, kNo, kNo, kNo, kNo, kNo, kNo, 1,   kNo, kNo, kNo, kNo, kNo, kNo, kNo,
    2, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo};
HWY_ALIGN constexpr std::uint8_t kSpreadSecond[32] = {
    3, kNo, kNo, kNo, kNo, kNo, kNo, kNo, 4,   kNo, kNo, kNo, kNo, kNo, kNo, kNo,
    5, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo, kNo};
constexpr std::uint64_t kBiasBits = 0x4330000000000000;  // 2^52: its last bit counts ones
constexpr double kBias = 4503599627370496.0;

HWY_INLINE hn::Vec<TSpreadBytes> LoadEight(const std::uint8_t* pixel) {
    std::uint64_t eight;
    hwy::CopyBytes<8>(pixel, &eight);
    return hn::BitCast(TSpreadBytes(), hn::Set(TSpreadWords(), eight));
}

/// Bytes as doubles that are 2^52 too large: no conversion is as quick.
HWY_INLINE TFour Biased(hn::Vec<TSpreadBytes> eight, const std::uint8_t* places) {
    const TSpreadWords words;
    const auto spread = hn::TableLookupBytesOr0(eight, hn::Load(TSpreadBytes(), places));
    return hn::BitCast(TDoubles(), hn::Or(hn::BitCast(words, spread), hn::Set(words, kBiasBits)));
}

/// Reads eight bytes.
HWY_INLINE TTaps LoadTaps(const std::uint8_t* pixel) {
    const auto eight = LoadEight(pixel);
    const TFour first = Biased(eight, kSpreadFirst);
    return {SubFour(first, All(kBias)), SubFour(Biased(eight, kSpreadSecond), first)};
}

HWY_INLINE void LoadPixels(const std::uint8_t* pixel, TFour& first, TFour& second) {
    const auto eight = LoadEight(pixel);
    first = SubFour(Biased(eight, kSpreadFirst), All(kBias));
    second = SubFour(Biased(eight, kSpreadSecond), All(kBias));
}

#else

HWY_INLINE TFour LoadPixel(const std::uint8_t* pixel) {
    return ToDoubles(hn::PromoteTo(TInts(), hn::LoadU(TFourBytes(), pixel)));
}

HWY_INLINE TTaps LoadTaps(const std::uint8_t* pixel) {
    const TFour value = LoadPixel(pixel);
    return {value, SubFour(LoadPixel(pixel + 3), value)};
}

HWY_INLINE void LoadPixels(const std::uint8_t* pixel, TFour& first, TFour& second) {
    first = LoadPixel(pixel);
    second = LoadPixel(pixel + 3);
}

#endif

/// Where neighbouring target pixels come from.
constexpr std::int32_t kPositions = 64;
struct TPositions {
    HWY_ALIGN std::int32_t offset[kPositions];  // bytes from the start of the row
    HWY_ALIGN std::int32_t row[kPositions];
    HWY_ALIGN double fx[kPositions];
    HWY_ALIGN double fy[kPositions];
};

/// Of `count` pixels, a multiple of four, from column `x` of the run on. Inside the image
/// positions are not negative: truncation is the floor.
HWY_INLINE void FindPositions(const TRotationRun& run, std::int32_t x, std::int32_t count,
                              TPositions& positions) {
    const TInts ints;
    const TFour p = All(run.row.p);
    const TFour q = All(run.row.q);
    for (std::int32_t k = 0; k < count; k += 4) {
        const TFour source_x = SubFour(LoadFour(run.a + x + k), p);
        const TFour source_y = AddFour(LoadFour(run.b + x + k), q);
        const auto i = Truncate(source_x);
        const auto j = Truncate(source_y);
        hn::Store(hn::Add(hn::Add(i, i), i), ints, positions.offset + k);
        hn::Store(j, ints, positions.row + k);
        StoreFour(SubFour(source_x, ToDoubles(i)), positions.fx + k);
        StoreFour(SubFour(source_y, ToDoubles(j)), positions.fy + k);
    }
}

struct TBilinear {
    /// from + (to - from) * fraction, the product rounded before the sum.
    static HWY_INLINE TFour Blend(const TTaps& taps, TFour fraction) {
        return AddFour(MulFour(taps.step, fraction), taps.value);
    }
    static HWY_INLINE hn::Vec<TInts> Pixel(const TRotationRun& run, const TPositions& positions,
                                           std::int32_t k) {
        const std::uint8_t* const* const rows = run.rows + positions.row[k];
        const std::int32_t offset = positions.offset[k];
        const TFour fx = All(positions.fx[k]);
        const TFour top = Blend(LoadTaps(rows[0] + offset), fx);
        const TFour bottom = Blend(LoadTaps(rows[1] + offset), fx);
        return Truncate(Blend({top, SubFour(bottom, top)}, All(positions.fy[k])));
    }
};

struct TBicubic {
    static HWY_INLINE void FindWeights(double t, double* weights) {
        weights[0] = -t * (1 - t) * (1 - t);
        weights[1] = 1 - 2 * t * t + t * t * t;
        weights[2] = (1 + t - t * t) * t;
        weights[3] = t * t * (t - 1);
    }
    static HWY_INLINE TFour WeighRow(const std::uint8_t* pixel, const double* weights) {
        TFour taps[4];
        LoadPixels(pixel - 3, taps[0], taps[1]);
        LoadPixels(pixel + 3, taps[2], taps[3]);
        TFour sum = MulFour(All(weights[0]), taps[0]);
        for (int i = 1; i < 4; ++i) {
            sum = AddFour(sum, MulFour(All(weights[i]), taps[i]));
        }
        return sum;
    }
    static HWY_INLINE hn::Vec<TInts> Pixel(const TRotationRun& run, const TPositions& positions,
                                           std::int32_t k) {
        double column_weights[4];
        double row_weights[4];
        FindWeights(positions.fx[k], column_weights);
        FindWeights(positions.fy[k], row_weights);
        const std::uint8_t* const* const rows = run.rows + positions.row[k] - 1;
        const std::int32_t offset = positions.offset[k];
        TFour sum = MulFour(All(row_weights[0]), WeighRow(rows[0] + offset, column_weights));
        for (int row = 1; row < 4; ++row) {
            sum = AddFour(
                sum, MulFour(All(row_weights[row]), WeighRow(rows[row] + offset, column_weights)));
        }
        // Sums of this size drop their fraction by the processor's own rounding, ties to even.
        const TFour unit = All(6755399441055744.0);  // 1.5 * 2^52
        const auto rounded = Truncate(SubFour(AddFour(sum, unit), unit));
        return hn::Min(hn::Max(rounded, hn::Zero(TInts())), hn::Set(TInts(), 255));
    }
};

HWY_ALIGN constexpr std::uint8_t kPixelsOfPlanes[16] = {0,  4, 8, 1,  5, 9, 2, 6,
                                                        10, 3, 7, 11, 0, 0, 0, 0};

/// Four pixels of 12 bytes are stored as 16; what is too many is overwritten by those behind.
template <typename Filter>
HWY_INLINE std::int32_t FilterRun(const TRotationRun& run) {
    const TBytes bytes;
    const auto order = hn::Load(bytes, kPixelsOfPlanes);
    const std::int32_t all = run.count < 6 ? 0 : (run.count - 2) / 4 * 4;
    std::uint8_t* out = run.out;
    TPositions positions;
    for (std::int32_t x = 0; x < all; x += kPositions) {
        const std::int32_t count = all - x < kPositions ? all - x : kPositions;
        FindPositions(run, x, count, positions);
        for (std::int32_t k = 0; k < count; k += 4, out += 12) {
            const auto here =
                reinterpret_cast<std::uintptr_t>(run.rows[positions.row[k]] + positions.offset[k]);
            hwy::Prefetch(reinterpret_cast<const std::uint8_t*>(here + run.ahead));
            const auto low = hn::Or(Filter::Pixel(run, positions, k),
                                    hn::ShiftLeft<8>(Filter::Pixel(run, positions, k + 1)));
            const auto high = hn::Or(hn::ShiftLeft<16>(Filter::Pixel(run, positions, k + 2)),
                                     hn::ShiftLeft<24>(Filter::Pixel(run, positions, k + 3)));
            const auto planes = hn::BitCast(bytes, hn::Or(low, high));
            hn::StoreU(hn::TableLookupBytes(planes, order), bytes, out);
        }
    }
    return all;
}

std::int32_t BilinearRun(const TRotationRun& run) {
    return FilterRun<TBilinear>(run);
}

std::int32_t BicubicRun(const TRotationRun& run) {
    return FilterRun<TBicubic>(run);
}

HWY_ALIGN constexpr std::uint8_t kWiden[16] = {0, 1, 2, 2, 3, 4, 5, 5, 6, 7, 8, 8, 9, 10, 11, 11};
HWY_ALIGN constexpr std::uint8_t kNarrow[16] = {0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, 0, 0, 0, 0};

/// Squares of four by four pixels: widened to four bytes each, exchanged across the diagonal, and
/// narrowed again.
std::int32_t TurnColumns(const std::uint8_t* const* rows, std::int32_t count, std::size_t column,
                         std::uint8_t* const* lines) {
    using TQuads = hn::FixedTag<std::uint32_t, 4>;
    using TPairs = hn::FixedTag<std::uint64_t, 2>;
    const TBytes bytes;
    const TQuads quads;
    const TPairs pairs;
    const auto widen = hn::Load(bytes, kWiden);
    const auto narrow = hn::Load(bytes, kNarrow);
    const std::size_t offset = column * 3;
    const auto load = [&](std::int32_t row) HWY_ATTR {
        return hn::BitCast(quads,
                           hn::TableLookupBytes(hn::LoadU(bytes, rows[row] + offset), widen));
    };
    std::int32_t i = 0;
    for (; count - i >= 4; i += 4) {
        const auto row0 = load(i);
        const auto row1 = load(i + 1);
        const auto row2 = load(i + 2);
        const auto row3 = load(i + 3);
        const auto low01 = hn::BitCast(pairs, hn::InterleaveLower(quads, row0, row1));
        const auto low23 = hn::BitCast(pairs, hn::InterleaveLower(quads, row2, row3));
        const auto high01 = hn::BitCast(pairs, hn::InterleaveUpper(quads, row0, row1));
        const auto high23 = hn::BitCast(pairs, hn::InterleaveUpper(quads, row2, row3));
        const std::size_t place = static_cast<std::size_t>(i) * 3;
        const auto store = [&](hn::Vec<TPairs> line, std::uint8_t* out) HWY_ATTR {
            hn::StoreU(hn::TableLookupBytes(hn::BitCast(bytes, line), narrow), bytes, out + place);
        };
        store(hn::InterleaveLower(pairs, low01, low23), lines[0]);
        store(hn::InterleaveUpper(pairs, low01, low23), lines[1]);
        store(hn::InterleaveLower(pairs, high01, high23), lines[2]);
        store(hn::InterleaveUpper(pairs, high01, high23), lines[3]);
    }
    return i;
}

HWY_ALIGN constexpr std::uint8_t kReversedPixels[16] = {13, 14, 15, 10, 11, 12, 7, 8,
                                                        9,  4,  5,  6,  1,  2,  3, 0};
constexpr std::int32_t kBlockPixels = 5;

/// Five pixels of 15 bytes from vectors of 16: one byte too many is read before them, and one
/// is written behind them, where the next pixels go.
std::int32_t ReverseBlocks(const std::uint8_t* row, std::int32_t width, std::uint8_t* out) {
    const TBytes bytes;
    const auto order = hn::Load(bytes, kReversedPixels);
    std::int32_t left = width;
    for (; left > kBlockPixels; left -= kBlockPixels, out += 3 * kBlockPixels) {
        const std::uint8_t* const from = row + static_cast<std::size_t>(left) * 3 - 16;
        hn::StoreU(hn::TableLookupBytes(hn::LoadU(bytes, from), order), bytes, out);
    }
    return width - left;
}

using TEightBytes = hn::FixedTag<std::uint8_t, 8>;
using TShorts = hn::FixedTag<std::int16_t, 8>;

/// The fixed-point product is (8 * (before - current) * fraction + 2^14) >> 15, which is the
/// stated sum: eight times a difference of bytes, and 4095, fit 16 bits.
HWY_INLINE hn::Vec<TEightBytes> BlendEight(const std::uint8_t* before, const std::uint8_t* current,
                                           hn::Vec<TShorts> fraction) {
    const TShorts shorts;
    const auto now = hn::PromoteTo(shorts, hn::LoadU(TEightBytes(), current));
    const auto last = hn::PromoteTo(shorts, hn::LoadU(TEightBytes(), before));
    const auto difference = hn::ShiftLeft<3>(hn::Sub(last, now));
    const auto moved = hn::MulFixedPoint15(difference, fraction);
    return hn::DemoteTo(TEightBytes(), hn::Add(now, moved));
}

std::int32_t BlendBlocks(const std::uint8_t* before, const std::uint8_t* current,
                         const std::int16_t* fractions, std::int16_t fraction, std::uint8_t* out,
                         std::int32_t byte_count) {
    const TShorts shorts;
    const auto same = hn::Set(shorts, fraction);
    std::int32_t i = 0;
    for (; byte_count - i >= 8; i += 8) {
        const auto factor = fractions != nullptr ? hn::LoadU(shorts, fractions + i) : same;
        hn::StoreU(BlendEight(before + i, current + i, factor), TEightBytes(), out + i);
    }
    return i;
}

#endif

}  // namespace zm::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace zm {

HWY_EXPORT(BicubicRun);
HWY_EXPORT(BilinearRun);
HWY_EXPORT(BlendBlocks);
HWY_EXPORT(ReverseBlocks);
HWY_EXPORT(TurnColumns);

std::int32_t BilinearRun24(const TRotationRun& run) {
    return HWY_DYNAMIC_DISPATCH(BilinearRun)(run);
}

std::int32_t BicubicRun24(const TRotationRun& run) {
    return HWY_DYNAMIC_DISPATCH(BicubicRun)(run);
}

std::int32_t TurnColumns24(const std::uint8_t* const* rows, std::int32_t count, std::size_t column,
                           std::uint8_t* const* lines) {
    return HWY_DYNAMIC_DISPATCH(TurnColumns)(rows, count, column, lines);
}

std::int32_t ShearBlocks(const std::uint8_t* before, const std::uint8_t* current,
                         const std::int16_t* fractions, std::int16_t fraction, std::uint8_t* out,
                         std::int32_t byte_count) {
    return HWY_DYNAMIC_DISPATCH(BlendBlocks)(before, current, fractions, fraction, out, byte_count);
}

std::int32_t ReverseBlocks24(const std::uint8_t* row, std::int32_t width, std::uint8_t* out) {
    return HWY_DYNAMIC_DISPATCH(ReverseBlocks)(row, width, out);
}

}  // namespace zm
#endif
