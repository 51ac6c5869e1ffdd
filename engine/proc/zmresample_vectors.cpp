// Vector loops of the kernel and the Fast linear engines.

#include <algorithm>
#include <cstddef>
#include <cstring>

#include "engine/proc/zmresample_p.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "engine/proc/zmresample_vectors.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace zm::HWY_NAMESPACE {

namespace hn = hwy::HWY_NAMESPACE;

#if HWY_TARGET == HWY_SCALAR

void MeanSpans(const std::uint8_t* in, const TMeanSpan* spans, std::size_t count,
               std::int32_t* out) {
    for (const TMeanSpan* span = spans; span != spans + count; ++span) {
        const std::uint8_t* pixel = in + static_cast<std::size_t>(span->left) * 3;
        std::int32_t sums[3] = {};
        for (std::int32_t i = 0; i < span->count * 3; ++i) {
            sums[i % 3] += pixel[i];
        }
        for (const std::int32_t sum : sums) {
            *out++ = sum / span->count;
        }
    }
}

void MeanWindows(const std::uint8_t* in, std::size_t bytes, const TMeanWindows& windows,
                 std::uint8_t* out) {
    for (std::size_t length = windows.shortest; length <= windows.longest; ++length, out += bytes) {
        for (std::size_t i = 0; i + (windows.longest - 1) * windows.step < bytes; ++i) {
            std::size_t sum = 0;
            for (std::size_t k = 0; k < length; ++k) {
                sum += in[i + k * windows.step];
            }
            out[i] = static_cast<std::uint8_t>(sum / length);
        }
    }
}

void PickPixels(const std::uint8_t* in, const std::uint32_t* places, std::size_t count,
                std::int32_t* out) {
    for (std::size_t x = 0; x < count; ++x, out += 3) {
        std::copy_n(in + places[x], 4, out);
    }
}

#else

using TByteTag = hn::ScalableTag<std::uint8_t>;
using TWordTag = hn::Repartition<std::uint16_t, TByteTag>;

/// Sums of the bytes at even places and of those at odd ones.
struct TWindowSums {
    hn::Vec<TWordTag> all;  ///< odd * 256 + even, modulo 65536
    hn::Vec<TWordTag> odd;
};

HWY_INLINE void AddToWindow(const std::uint8_t* in, TWindowSums& sums) {
    const auto bytes = hn::BitCast(TWordTag(), hn::LoadU(TByteTag(), in));
    sums.all = hn::Add(sums.all, bytes);
    sums.odd = hn::Add(sums.odd, hn::ShiftRight<8>(bytes));
}

HWY_INLINE void StoreWindow(const TWindowSums& sums, std::size_t length, std::uint8_t* out) {
    const TWordTag tag;
    const auto factor = hn::Set(tag, MeanFactor(length));
    const auto even = hn::MulHigh(hn::Sub(sums.all, hn::ShiftLeft<8>(sums.odd)), factor);
    const auto odd = hn::MulHigh(sums.odd, factor);
    const auto both = hn::Or(even, hn::ShiftLeft<8>(odd));
    hn::StoreU(hn::BitCast(TByteTag(), both), TByteTag(), out);
}

/// The last vector overlaps the one before it.
void MeanWindows(const std::uint8_t* in, std::size_t bytes, const TMeanWindows& windows,
                 std::uint8_t* out) {
    const std::size_t lanes = hn::Lanes(TByteTag());
    const std::size_t step = windows.step;
    const std::size_t shortest = windows.shortest;
    const std::size_t last = bytes - (windows.longest - 1) * step - lanes;
    for (std::size_t i = 0;; i = i + lanes < last ? i + lanes : last) {
        TWindowSums sums{hn::Zero(TWordTag()), hn::Zero(TWordTag())};
        const std::uint8_t* const end = in + i + shortest * step;
        for (const std::uint8_t* at = in + i; at != end; at += step) {
            AddToWindow(at, sums);
        }
        StoreWindow(sums, shortest, out + i);
        if (windows.longest > shortest) {
            AddToWindow(end, sums);
            StoreWindow(sums, windows.longest, out + bytes + i);
        }
        if (i == last) {
            return;
        }
    }
}

void PickPixels(const std::uint8_t* in, const std::uint32_t* places, std::size_t count,
                std::int32_t* out) {
    const hn::FixedTag<std::uint8_t, 4> byte_tag;
    const hn::FixedTag<std::int32_t, 4> int_tag;
    for (std::size_t x = 0; x < count; ++x, out += 3) {
        hn::StoreU(hn::PromoteTo(int_tag, hn::LoadU(byte_tag, in + places[x])), int_tag, out);
    }
}

/// The channels of a pixel side by side; the fourth lane belongs to the next pixel.
void MeanSpans(const std::uint8_t* in, const TMeanSpan* spans, std::size_t count,
               std::int32_t* out) {
    const hn::FixedTag<std::uint8_t, 4> byte_tag;
    const hn::FixedTag<std::int32_t, 4> int_tag;
    const hn::FixedTag<float, 4> float_tag;
    const auto half = hn::Set(float_tag, 0.5f);
    for (std::size_t x = 0; x < count; ++x, out += 3) {
        const TMeanSpan span = spans[x];
        const std::uint8_t* pixel = in + static_cast<std::size_t>(span.left) * 3;
        auto sums = hn::Zero(int_tag);
        for (std::int32_t i = 0; i < span.count; ++i, pixel += 3) {
            sums = hn::Add(sums, hn::PromoteTo(int_tag, hn::LoadU(byte_tag, pixel)));
        }
        const auto quotient = hn::Mul(hn::Add(hn::ConvertTo(float_tag, sums), half),
                                      hn::Set(float_tag, span.reciprocal));
        hn::StoreU(hn::ConvertTo(int_tag, quotient), int_tag, out);
    }
}

#endif

// Pairs: the product of two 16-bit numbers with two others, summed to 32 bits, is one instruction
// where bytes can be shuffled too.

#if HWY_ARCH_X86 && HWY_TARGET <= HWY_SSSE3

using TPairSums = hn::CappedTag<std::int32_t, kMaxPairRows * 4>;

std::size_t RowsAtOnce() {
    return hn::Lanes(TPairSums()) / 4;
}

void SpreadPairs(const std::uint8_t* in, std::size_t pairs, std::size_t slot, std::int16_t* area) {
    const hn::Full128<std::uint8_t> tag;
    alignas(16) static constexpr std::uint8_t kPlaces[16] = {0, 128, 3, 128, 1,   128, 4,   128,
                                                             2, 128, 5, 128, 128, 128, 128, 128};
    const auto places = hn::Load(tag, kPlaces);
    const std::size_t step = RowsAtOnce() * kPairNumbers;
    std::int16_t* out = area + slot * kPairNumbers;
    const hn::CappedTag<std::uint8_t, 8> half_tag;
    for (std::size_t i = 0; i < pairs; ++i, in += 6, out += step) {
        const auto bytes = hn::ZeroExtendVector(tag, hn::LoadU(half_tag, in));
        hn::Store(hn::TableLookupBytesOr0(bytes, places), tag,
                  reinterpret_cast<std::uint8_t*>(out));
    }
}

/// Limited quotients of the sums of one target pixel; a row's fourth byte belongs to the next.
template <class D>
HWY_INLINE void StoreQuotients(D tag, hn::Vec<D> sums, const TQuotient& quotient, std::uint8_t* out,
                               std::size_t out_step) {
    const hn::RebindToFloat<D> float_tag;
    const hn::Rebind<std::uint8_t, D> byte_tag;
    auto value = hn::Add(hn::ConvertTo(float_tag, sums), hn::Set(float_tag, quotient.Half()));
    value = hn::Mul(value, hn::Set(float_tag, quotient.Reciprocal()));
    value = hn::Min(hn::Max(value, hn::Zero(float_tag)), hn::Set(float_tag, 255.0f));
    alignas(16) std::uint8_t bytes[kMaxPairRows * 4];
    hn::Store(hn::DemoteTo(byte_tag, hn::ConvertTo(tag, value)), byte_tag, bytes);
    for (std::size_t slot = 0; slot < hn::Lanes(tag) / 4; ++slot) {
        std::memcpy(out + slot * out_step, bytes + slot * 4, 4);
    }
}

void FilterPairs(const TPairRow& row, const std::int16_t* area, std::uint8_t* out,
                 std::size_t out_step) {
    const TPairSums tag;
    const hn::Repartition<std::int16_t, TPairSums> pair_tag;
    const std::size_t step = hn::Lanes(pair_tag);
    auto unused = hn::Zero(tag);
    const auto add_pair = [&](std::size_t i, const std::int16_t* at, auto sum) HWY_ATTR {
        const auto weights = hn::BitCast(pair_tag, hn::Set(tag, row.pairs[i]));
        return hn::ReorderWidenMulAccumulate(tag, hn::Load(pair_tag, at), weights, sum, unused);
    };
    for (std::size_t x = 0; x < row.count; ++x, out += 3) {
        const std::int16_t* at = area + row.starts[x] * step;
        auto even = hn::Zero(tag);
        auto odd = hn::Zero(tag);
        std::size_t i = row.firsts[x];
        const std::size_t end = row.firsts[x + 1];
        for (; i + 2 <= end; i += 2, at += 2 * step) {
            even = add_pair(i, at, even);
            odd = add_pair(i + 1, at + step, odd);
        }
        if (i < end) {
            even = add_pair(i, at, even);
        }
        StoreQuotients(tag, hn::Add(even, odd), row.quotients[x], out, out_step);
    }
}

// Short spans: a span lies in one block of 16 bytes, a vector takes as many spans as it has blocks.

bool ShortSpansAreKnown() {
    return true;
}

/// Bytes from as many places as the vector has blocks.
template <class D>
HWY_INLINE hn::Vec<D> LoadBlocks(D tag, const std::uint8_t* in, const std::uint32_t* places) {
    if constexpr (hn::MaxLanes(D()) <= kPairBytes) {
        return hn::LoadU(tag, in + places[0]);
    } else {
        const hn::Half<D> half;
        constexpr std::size_t kBlocks = hn::MaxLanes(hn::Half<D>()) / kPairBytes;
        return hn::Combine(tag, LoadBlocks(half, in, places + kBlocks),
                           LoadBlocks(half, in, places));
    }
}

/// Each channel's numbers of two pixels become one 32-bit lane of two words.
template <std::size_t kFullPairs>
std::size_t MeanShortSpansOf(const std::uint8_t* in, const TShortSpans& spans, std::int32_t* out) {
    const hn::CappedTag<std::uint8_t, kMeanPadding * 4> tag;
    const hn::Repartition<std::int16_t, decltype(tag)> word_tag;
    const hn::Repartition<std::uint16_t, decltype(tag)> factor_tag;
    const hn::Repartition<std::int32_t, decltype(tag)> int_tag;
    alignas(16) static constexpr std::uint8_t kPairs[2][kPairBytes] = {
        {0, 128, 3, 128, 1, 128, 4, 128, 2, 128, 5, 128, 128, 128, 128, 128},
        {6, 128, 9, 128, 7, 128, 10, 128, 8, 128, 11, 128, 128, 128, 128, 128}};
    alignas(64) std::int32_t three_of_four[kMeanPadding];
    const std::size_t lanes = hn::Lanes(int_tag);
    for (std::size_t i = 0; i < lanes; ++i) {
        three_of_four[i] = static_cast<std::int32_t>(i < lanes / 4 * 3 ? i / 3 * 4 + i % 3 : i);
    }
    const auto packed = hn::SetTableIndices(int_tag, three_of_four);
    const auto first = hn::LoadDup128(tag, kPairs[0]);
    const auto second = hn::LoadDup128(tag, kPairs[1]);
    const auto ones = hn::Set(word_tag, 1);
    const std::size_t step = lanes / 4;
    std::size_t x = 0;
    for (; x + step <= spans.count; x += step, out += step * 3) {
        const auto bytes = LoadBlocks(tag, in, spans.places + x);
        const auto last = hn::LoadU(tag, spans.last_pairs + x * kPairBytes);
        auto words = hn::BitCast(word_tag, hn::TableLookupBytesOr0(bytes, last));
        if (kFullPairs > 0) {
            words = hn::Add(words, hn::BitCast(word_tag, hn::TableLookupBytesOr0(bytes, first)));
        }
        if (kFullPairs > 1) {
            words = hn::Add(words, hn::BitCast(word_tag, hn::TableLookupBytesOr0(bytes, second)));
        }
        auto unused = hn::Zero(int_tag);
        const auto sums = hn::ReorderWidenMulAccumulate(int_tag, words, ones, unused, unused);
        const auto factors =
            hn::LoadU(hn::Repartition<std::uint32_t, decltype(tag)>(), spans.factors + x * 4);
        const auto means =
            hn::MulHigh(hn::BitCast(factor_tag, sums), hn::BitCast(factor_tag, factors));
        hn::StoreU(hn::TableLookupLanes(hn::BitCast(int_tag, means), packed), int_tag, out);
    }
    return x;
}

std::size_t MeanShortSpans(const std::uint8_t* in, const TShortSpans& spans, std::int32_t* out) {
    switch ((spans.longest - 1) / 2) {
        case 0: return MeanShortSpansOf<0>(in, spans, out);
        case 1: return MeanShortSpansOf<1>(in, spans, out);
        default: return MeanShortSpansOf<2>(in, spans, out);
    }
}

#else

bool ShortSpansAreKnown() {
    return false;
}

std::size_t MeanShortSpans(const std::uint8_t* /*in*/, const TShortSpans& /*spans*/,
                           std::int32_t* /*out*/) {
    return 0;
}

std::size_t RowsAtOnce() {
    return 1;
}

void SpreadPairs(const std::uint8_t* in, std::size_t pairs, std::size_t /*slot*/,
                 std::int16_t* area) {
    for (std::size_t i = 0; i < pairs; ++i, in += 6, area += kPairNumbers) {
        for (std::size_t c = 0; c < 3; ++c) {
            area[2 * c] = in[c];
            area[2 * c + 1] = in[c + 3];
        }
    }
}

void FilterPairs(const TPairRow& row, const std::int16_t* area, std::uint8_t* out,
                 std::size_t /*out_step*/) {
    for (std::size_t x = 0; x < row.count; ++x) {
        const std::int16_t* at = area + row.starts[x] * kPairNumbers;
        std::int32_t sums[3] = {};
        for (std::size_t i = row.firsts[x]; i < row.firsts[x + 1]; ++i, at += kPairNumbers) {
            const auto left = static_cast<std::int16_t>(row.pairs[i] & 0xFFFF);
            const std::int32_t right = row.pairs[i] >> 16;
            for (std::size_t c = 0; c < 3; ++c) {
                sums[c] += left * at[2 * c] + right * at[2 * c + 1];
            }
        }
        for (const std::int32_t sum : sums) {
            *out++ = row.quotients[x](static_cast<float>(sum));
        }
    }
}

#endif

/// `kBlocks` vectors of samples, summed over all rows before they are stored.
template <std::size_t kBlocks, class D>
HWY_INLINE void MixBlocks(D tag, const TWeightedRows& rows, std::size_t first, std::uint8_t* out) {
    const hn::Rebind<std::int32_t, D> int_tag;
    const hn::Rebind<std::uint8_t, D> byte_tag;
    const std::size_t lanes = hn::Lanes(tag);
    hn::Vec<D> sums[kBlocks];
    for (auto& sum : sums) {
        sum = hn::Set(tag, rows.quotient.Half());
    }
    for (std::size_t row = 0; row < rows.row_count; ++row) {
        const auto weight = hn::Set(tag, rows.weights[row]);
        const std::uint8_t* const at = rows.rows[row] + first;
        for (std::size_t k = 0; k < kBlocks; ++k) {
            const auto bytes = hn::PromoteTo(int_tag, hn::LoadU(byte_tag, at + k * lanes));
            sums[k] = hn::MulAdd(hn::ConvertTo(tag, bytes), weight, sums[k]);
        }
    }
    for (std::size_t k = 0; k < kBlocks; ++k) {
        auto value = hn::Mul(sums[k], hn::Set(tag, rows.quotient.Reciprocal()));
        value = hn::Min(hn::Max(value, hn::Zero(tag)), hn::Set(tag, 255.0f));
        hn::StoreU(hn::DemoteTo(byte_tag, hn::ConvertTo(int_tag, value)), byte_tag,
                   out + first + k * lanes);
    }
}

void MixRows(const TWeightedRows& rows, std::size_t count, std::uint8_t* out) {
    constexpr std::size_t kBlocks = 4;
    const hn::ScalableTag<float> wide;
    const hn::CappedTag<float, 1> narrow;
    const std::size_t lanes = hn::Lanes(wide);
    std::size_t i = 0;
    for (; i + kBlocks * lanes <= count; i += kBlocks * lanes) {
        MixBlocks<kBlocks>(wide, rows, i, out);
    }
    for (; i + lanes <= count; i += lanes) {
        MixBlocks<1>(wide, rows, i, out);
    }
    for (; i < count; ++i) {
        MixBlocks<1>(narrow, rows, i, out);
    }
}

void AddNumbers(const std::int32_t* numbers, std::size_t count, std::int32_t* sums) {
    const hn::ScalableTag<std::int32_t> tag;
    const std::size_t lanes = hn::Lanes(tag);
    std::size_t i = 0;
    for (; i + lanes <= count; i += lanes) {
        hn::StoreU(hn::Add(hn::LoadU(tag, sums + i), hn::LoadU(tag, numbers + i)), tag, sums + i);
    }
    for (; i < count; ++i) {
        sums[i] += numbers[i];
    }
}

template <class D>
HWY_INLINE void DivideVector(D tag, const std::int32_t* sums, const TQuotient& quotient,
                             std::uint8_t* out) {
    const hn::Rebind<std::int32_t, D> int_tag;
    const hn::Rebind<std::uint8_t, D> byte_tag;
    auto value = hn::ConvertTo(tag, hn::LoadU(int_tag, sums));
    value =
        hn::Mul(hn::Add(value, hn::Set(tag, quotient.Half())), hn::Set(tag, quotient.Reciprocal()));
    value = hn::Min(hn::Max(value, hn::Zero(tag)), hn::Set(tag, 255.0f));
    hn::StoreU(hn::DemoteTo(byte_tag, hn::ConvertTo(int_tag, value)), byte_tag, out);
}

void DivideNumbers(const std::int32_t* sums, std::size_t count, const TQuotient& quotient,
                   std::uint8_t* out) {
    const hn::ScalableTag<float> wide;
    const hn::CappedTag<float, 1> narrow;
    std::size_t i = 0;
    for (const std::size_t lanes = hn::Lanes(wide); i + lanes <= count; i += lanes) {
        DivideVector(wide, sums + i, quotient, out + i);
    }
    for (; i < count; ++i) {
        DivideVector(narrow, sums + i, quotient, out + i);
    }
}

template <class D>
HWY_INLINE bool BlendVector(D tag, const TBlendRows& rows, std::size_t i, std::uint8_t* out) {
    const hn::Rebind<std::int32_t, D> int_tag;
    const hn::Rebind<std::uint8_t, D> byte_tag;
    const auto upper = hn::LoadU(int_tag, rows.upper + i);
    const auto step = hn::Sub(hn::LoadU(int_tag, rows.lower + i), upper);
    const auto value = hn::MulAdd(hn::ConvertTo(tag, step), hn::Set(tag, rows.fraction),
                                  hn::ConvertTo(tag, upper));
    const auto rounded = hn::NearestInt(value);
    hn::StoreU(hn::DemoteTo(byte_tag, rounded), byte_tag, out + i);
    const auto distance = hn::Abs(hn::Sub(value, hn::ConvertTo(tag, rounded)));
    return !hn::AllFalse(tag, hn::Gt(distance, hn::Set(tag, rows.tie_start)));
}

bool BlendInts(const TBlendRows& rows, std::size_t count, std::uint8_t* out) {
    const hn::ScalableTag<float> wide;
    const hn::CappedTag<float, 1> narrow;
    bool near_tie = false;
    std::size_t i = 0;
    for (const std::size_t lanes = hn::Lanes(wide); i + lanes <= count; i += lanes) {
        near_tie |= BlendVector(wide, rows, i, out);
    }
    for (; i < count; ++i) {
        near_tie |= BlendVector(narrow, rows, i, out);
    }
    return near_tie;
}

}  // namespace zm::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace zm {

HWY_EXPORT(AddNumbers);
HWY_EXPORT(BlendInts);
HWY_EXPORT(DivideNumbers);
HWY_EXPORT(FilterPairs);
HWY_EXPORT(MeanShortSpans);
HWY_EXPORT(MeanSpans);
HWY_EXPORT(MeanWindows);
HWY_EXPORT(MixRows);
HWY_EXPORT(PickPixels);
HWY_EXPORT(RowsAtOnce);
HWY_EXPORT(ShortSpansAreKnown);
HWY_EXPORT(SpreadPairs);

std::size_t PairRowsAtOnce() {
    return HWY_DYNAMIC_DISPATCH(RowsAtOnce)();
}

void SpreadPairs24(const std::uint8_t* in, std::size_t pairs, std::size_t slot,
                   std::int16_t* area) {
    HWY_DYNAMIC_DISPATCH(SpreadPairs)(in, pairs, slot, area);
}

void FilterPairs24(const TPairRow& row, const std::int16_t* area, std::uint8_t* out,
                   std::size_t out_step) {
    HWY_DYNAMIC_DISPATCH(FilterPairs)(row, area, out, out_step);
}

void MixByteRows(const TWeightedRows& rows, std::size_t count, std::uint8_t* out) {
    HWY_DYNAMIC_DISPATCH(MixRows)(rows, count, out);
}

void MeanSpans24(const std::uint8_t* in, const TMeanSpan* spans, std::size_t count,
                 std::int32_t* out) {
    HWY_DYNAMIC_DISPATCH(MeanSpans)(in, spans, count, out);
}

bool HasShortSpans() {
    return HWY_DYNAMIC_DISPATCH(ShortSpansAreKnown)();
}

std::size_t MeanShortSpans24(const std::uint8_t* in, const TShortSpans& spans, std::int32_t* out) {
    return HWY_DYNAMIC_DISPATCH(MeanShortSpans)(in, spans, out);
}

void MeanWindowsOfRow(const std::uint8_t* in, std::size_t bytes, const TMeanWindows& windows,
                      std::uint8_t* out) {
    HWY_DYNAMIC_DISPATCH(MeanWindows)(in, bytes, windows, out);
}

void PickPixels24(const std::uint8_t* in, const std::uint32_t* places, std::size_t count,
                  std::int32_t* out) {
    HWY_DYNAMIC_DISPATCH(PickPixels)(in, places, count, out);
}

void AddInts(const std::int32_t* numbers, std::size_t count, std::int32_t* sums) {
    HWY_DYNAMIC_DISPATCH(AddNumbers)(numbers, count, sums);
}

void DivideInts(const std::int32_t* sums, std::size_t count, const TQuotient& quotient,
                std::uint8_t* out) {
    HWY_DYNAMIC_DISPATCH(DivideNumbers)(sums, count, quotient, out);
}

bool BlendIntRows(const TBlendRows& rows, std::size_t count, std::uint8_t* out) {
    return HWY_DYNAMIC_DISPATCH(BlendInts)(rows, count, out);
}

}  // namespace zm
#endif
