// Vector loops of the kernel and the Fast linear engines.

#include <cstddef>

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

void FilterPixels(const TTapRow& row, const float* samples, std::uint8_t* out) {
    for (std::size_t x = 0; x < row.count; ++x) {
        float sums[3] = {};
        for (std::size_t i = row.starts[x]; i < row.starts[x + 1]; ++i) {
            const float* pixel = samples + static_cast<std::size_t>(row.taps[i].pixel) * 3;
            for (std::size_t c = 0; c < 3; ++c) {
                sums[c] += row.weights[i] * pixel[c];
            }
        }
        for (const float sum : sums) {
            *out++ = row.quotients[x](sum);
        }
    }
}

#else

/// One tap's share of the channels of a pixel. Whole numbers: contracted or not, it is exact.
template <class D>
HWY_INLINE hn::Vec<D> AddTap(D tag, const TTapRow& row, std::size_t i, const float* samples,
                             hn::Vec<D> sum) {
    const float* pixel = samples + static_cast<std::size_t>(row.taps[i].pixel) * 3;
    return hn::MulAdd(hn::Set(tag, row.weights[i]), hn::LoadU(tag, pixel), sum);
}

void FilterPixels(const TTapRow& row, const float* samples, std::uint8_t* out) {
    const hn::FixedTag<float, 4> tag;
    const hn::FixedTag<std::int32_t, 4> int_tag;
    const hn::FixedTag<std::uint8_t, 4> byte_tag;
    for (std::size_t x = 0; x < row.count; ++x, out += 3) {
        auto even = hn::Zero(tag);
        auto odd = hn::Zero(tag);
        std::size_t i = row.starts[x];
        const std::size_t end = row.starts[x + 1];
        for (; i + 2 <= end; i += 2) {
            even = AddTap(tag, row, i, samples, even);
            odd = AddTap(tag, row, i + 1, samples, odd);
        }
        if (i < end) {
            even = AddTap(tag, row, i, samples, even);
        }
        const TQuotient quotient = row.quotients[x];
        auto value = hn::Add(hn::Add(even, odd), hn::Set(tag, quotient.Half()));
        value = hn::Mul(value, hn::Set(tag, quotient.Reciprocal()));
        value = hn::Min(hn::Max(value, hn::Zero(tag)), hn::Set(tag, 255.0f));
        hn::StoreU(hn::DemoteTo(byte_tag, hn::ConvertTo(int_tag, value)), byte_tag, out);
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

HWY_EXPORT(BlendInts);
HWY_EXPORT(FilterPixels);
HWY_EXPORT(MeanSpans);

void FilterPixels24(const TTapRow& row, const float* samples, std::uint8_t* out) {
    HWY_DYNAMIC_DISPATCH(FilterPixels)(row, samples, out);
}

void MeanSpans24(const std::uint8_t* in, const TMeanSpan* spans, std::size_t count,
                 std::int32_t* out) {
    HWY_DYNAMIC_DISPATCH(MeanSpans)(in, spans, count, out);
}

bool BlendIntRows(const TBlendRows& rows, std::size_t count, std::uint8_t* out) {
    return HWY_DYNAMIC_DISPATCH(BlendInts)(rows, count, out);
}

}  // namespace zm
#endif
