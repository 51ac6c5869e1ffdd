// Vector loops of the area engine: sums of rows and columns (shrinking), filtered rows and their
// mixtures (enlarging).

#include <cstddef>
#include <utility>

#include "engine/proc/zmresample_area_p.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "engine/proc/zmresample_area_vectors.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace zm::HWY_NAMESPACE {

namespace hn = hwy::HWY_NAMESPACE;

/// Stores rounded values as samples, and gives them back as they were before the narrowing.
template <class D>
HWY_INLINE hn::Vec<D> StoreRounded(D tag, hn::Vec<D> values, std::uint8_t* out) {
    const hn::Rebind<std::uint8_t, D> byte_tag;
    const auto rounded = hn::NearestInt(values);
    hn::StoreU(hn::DemoteTo(byte_tag, rounded), byte_tag, out);
    return hn::ConvertTo(tag, rounded);
}

template <class D>
HWY_INLINE hn::Vec<D> StoreRounded(D, hn::Vec<D> values, std::uint16_t* out) {
    const hn::Rebind<std::int32_t, D> int_tag;
    const hn::Rebind<std::uint16_t, D> word_tag;
    const auto rounded = hn::Round(values);
    hn::StoreU(hn::DemoteTo(word_tag, hn::DemoteTo(int_tag, rounded)), word_tag, out);
    return rounded;
}

/// Runs `step(tag, i)` over whole vectors and then sample by sample.
template <typename Real, typename Step>
HWY_INLINE void ForBlocks(std::size_t count, const Step& step) {
    const hn::ScalableTag<Real> wide;
    const hn::CappedTag<Real, 1> narrow;
    std::size_t i = 0;
    for (const std::size_t lanes = hn::Lanes(wide); i + lanes <= count; i += lanes) {
        step(wide, i);
    }
    for (; i < count; ++i) {
        step(narrow, i);
    }
}

/// Notes the samples from `first` on whose value lies too far from the rounded one.
template <class D, typename Real>
HWY_INLINE void NoteTies(D tag, hn::Vec<D> value, hn::Vec<D> rounded, std::size_t first,
                         TTieList<Real>& ties) {
    // Exact results have no margin, and nothing lies further away than one half.
    if (ties.start >= Real{0.5}) {
        return;
    }
    const auto near = hn::Gt(hn::Abs(hn::Sub(value, rounded)), hn::Set(tag, ties.start));
    if (HWY_LIKELY(hn::AllFalse(tag, near))) {
        return;
    }
    HWY_ALIGN std::uint8_t bits[8] = {};
    hn::StoreMaskBits(tag, near, bits);
    for (std::size_t lane = 0; lane < hn::Lanes(tag); ++lane) {
        if ((bits[lane / 8] >> (lane % 8) & 1) != 0) {
            ties.samples[ties.count++] = static_cast<std::uint32_t>(first + lane);
        }
    }
}

// Spreading: vectors of samples picked out of vectors of the source.

template <typename Real>
void PlanSpread(TSpreadPlan& plan) {
    const std::size_t lanes = hn::Lanes(hn::ScalableTag<Real>());
    plan.offsets.resize((plan.offsets.size() + lanes - 1) / lanes * lanes, plan.offsets.back());
    for (std::size_t first = 0; first < plan.offsets.size(); first += lanes) {
        std::int32_t* const offsets = plan.offsets.data() + first;
        std::int32_t base = offsets[0];
        for (std::size_t lane = 1; lane < lanes; ++lane) {
            base = HWY_MIN(base, offsets[lane]);
        }
        for (std::size_t lane = 0; lane < lanes; ++lane) {
            offsets[lane] -= base;
        }
        plan.bases.push_back(base);
    }
}

template <class D>
HWY_INLINE auto LoadOffsets(D, const std::int32_t* offsets) {
    const hn::RebindToSigned<D> wide;
    if constexpr (sizeof(hn::TFromD<D>) == sizeof(std::int32_t)) {
        return hn::LoadU(wide, offsets);
    } else {
        return hn::PromoteTo(wide, hn::LoadU(hn::Rebind<std::int32_t, D>(), offsets));
    }
}

/// The sums of vector `i` of the plan.
template <class D, typename Real, std::size_t kTaps>
HWY_INLINE hn::Vec<D> SpreadVector(D tag, const TSpreadPlan& plan,
                                   const TSpreadRow<Real, kTaps>& row, std::size_t i) {
    const std::size_t first = i * hn::Lanes(tag);
    const auto offsets = LoadOffsets(tag, plan.offsets.data() + first);
    const Real* const from = row.samples + plan.bases[i];
    const auto pick = [&](std::size_t k) HWY_ATTR {
        if constexpr (hn::MaxLanes(D()) < 4) {
            // The way back to the start of a pixel is longer than such a vector.
            return hn::GatherIndex(tag, from + k * row.step, offsets);
        } else {
            return hn::TableLookupLanes(hn::LoadU(tag, from + k * row.step),
                                        hn::IndicesFromVec(tag, offsets));
        }
    };
    auto sum = hn::Mul(hn::LoadU(tag, row.weights[0] + first), pick(0));
    for (std::size_t k = 1; k < kTaps; ++k) {
        sum = hn::MulAdd(hn::LoadU(tag, row.weights[k] + first), pick(k), sum);
    }
    return sum;
}

template <typename Real, std::size_t kTaps>
HWY_INLINE void Spread(const TSpreadPlan& plan, const TSpreadRow<Real, kTaps>& row, Real* out) {
    const hn::ScalableTag<Real> tag;
    for (std::size_t i = 0; i < plan.bases.size(); ++i) {
        hn::StoreU(SpreadVector(tag, plan, row, i), tag, out + i * hn::Lanes(tag));
    }
}

template <typename Real>
HWY_INLINE void SpreadCubic(const TSpreadPlan& plan, const TSpreadRow<Real, 4>& row, Real limit,
                            Real* out, TTieList<Real>& ties) {
    const hn::ScalableTag<Real> tag;
    for (std::size_t i = 0; i < plan.bases.size(); ++i) {
        const std::size_t first = i * hn::Lanes(tag);
        const auto sum = SpreadVector(tag, plan, row, i);
        const auto value = hn::Min(hn::Max(sum, hn::Zero(tag)), hn::Set(tag, limit));
        const auto rounded = hn::Round(value);
        hn::StoreU(rounded, tag, out + first);
        NoteTies(tag, value, rounded, first, ties);
    }
}

void SpreadOne8(const TSpreadPlan& plan, const TSpreadRow<float, 1>& row, float* out) {
    Spread(plan, row, out);
}
void SpreadOne16(const TSpreadPlan& plan, const TSpreadRow<double, 1>& row, double* out) {
    Spread(plan, row, out);
}
void SpreadTwo8(const TSpreadPlan& plan, const TSpreadRow<float, 2>& row, float* out) {
    Spread(plan, row, out);
}
void SpreadTwo16(const TSpreadPlan& plan, const TSpreadRow<double, 2>& row, double* out) {
    Spread(plan, row, out);
}
void SpreadCubic8(const TSpreadPlan& plan, const TSpreadRow<float, 4>& row, float limit, float* out,
                  TTieList<float>& ties) {
    SpreadCubic(plan, row, limit, out, ties);
}
void SpreadCubic16(const TSpreadPlan& plan, const TSpreadRow<double, 4>& row, double limit,
                   double* out, TTieList<double>& ties) {
    SpreadCubic(plan, row, limit, out, ties);
}
void PlanSpread8(TSpreadPlan& plan) {
    PlanSpread<float>(plan);
}
void PlanSpread16(TSpreadPlan& plan) {
    PlanSpread<double>(plan);
}

// Shrinking.

template <class D>
HWY_INLINE hn::Vec<D> LoadSamplesAt(D tag, const std::uint8_t* at) {
    const hn::Rebind<std::int32_t, D> int_tag;
    const auto numbers = hn::PromoteTo(int_tag, hn::LoadU(hn::Rebind<std::uint8_t, D>(), at));
    if constexpr (sizeof(hn::TFromD<D>) == sizeof(double)) {
        return hn::PromoteTo(tag, numbers);
    } else {
        return hn::ConvertTo(tag, numbers);
    }
}

template <class D>
HWY_INLINE hn::Vec<D> LoadSamplesAt(D tag, const std::uint16_t* at) {
    const hn::Rebind<std::int32_t, D> int_tag;
    return hn::PromoteTo(tag,
                         hn::PromoteTo(int_tag, hn::LoadU(hn::Rebind<std::uint16_t, D>(), at)));
}

template <typename Sample, typename Real>
HWY_INLINE void SumRows(const TSummedRows<Sample, Real>& rows, std::size_t count, TSumStart start,
                        Real* sums) {
    ForBlocks<Real>(count, [&](auto tag, std::size_t i) HWY_ATTR {
        auto sum = start == TSumStart::kFresh ? hn::Zero(tag) : hn::LoadU(tag, sums + i);
        for (std::size_t row = 0; row < rows.row_count; ++row) {
            sum = hn::MulAdd(hn::Set(tag, rows.weights[row]),
                             LoadSamplesAt(tag, rows.rows[row] + i), sum);
        }
        hn::StoreU(sum, tag, sums + i);
    });
}

void SumRows8(const TSummedRows<std::uint8_t>& rows, std::size_t count, TSumStart start,
              float* sums) {
    SumRows(rows, count, start, sums);
}
void SumRows8Precise(const TSummedRows<std::uint8_t, double>& rows, std::size_t count,
                     TSumStart start, double* sums) {
    SumRows(rows, count, start, sums);
}
void SumRows16(const TSummedRows<std::uint16_t>& rows, std::size_t count, TSumStart start,
               double* sums) {
    SumRows(rows, count, start, sums);
}

#if HWY_TARGET == HWY_SCALAR

void SumPixels(const TAxisTaps& taps, const float* in, float scale, float* out) {
    for (std::size_t x = 0; x < taps.count; ++x) {
        float sums[3] = {};
        for (std::size_t i = taps.starts[x]; i < taps.starts[x + 1]; ++i) {
            const float* pixel = in + static_cast<std::size_t>(taps.taps[i].index) * 3;
            for (std::size_t c = 0; c < 3; ++c) {
                sums[c] += taps.taps[i].weight * pixel[c];
            }
        }
        for (const float sum : sums) {
            *out++ = sum * scale;
        }
    }
}

#else

/// The channels of a pixel side by side; the fourth lane belongs to the next pixel.
void SumPixels(const TAxisTaps& taps, const float* in, float scale, float* out) {
    const hn::FixedTag<float, 4> tag;
    const auto add = [&](const TAxisTap<float>& tap, auto sum) HWY_ATTR {
        const float* pixel = in + static_cast<std::size_t>(tap.index) * 3;
        return hn::MulAdd(hn::Set(tag, tap.weight), hn::LoadU(tag, pixel), sum);
    };
    for (std::size_t x = 0; x < taps.count; ++x, out += 3) {
        auto even = hn::Zero(tag);
        auto odd = hn::Zero(tag);
        std::size_t i = taps.starts[x];
        const std::size_t end = taps.starts[x + 1];
        for (; i + 2 <= end; i += 2) {
            even = add(taps.taps[i], even);
            odd = add(taps.taps[i + 1], odd);
        }
        if (i < end) {
            even = add(taps.taps[i], even);
        }
        hn::StoreU(hn::Mul(hn::Add(even, odd), hn::Set(tag, scale)), tag, out);
    }
}

#endif

// Blending.

template <typename Real, typename Sample>
void BlendLinear(const TLinearRows<Real>& rows, std::size_t count, Sample* out,
                 TTieList<Real>& ties) {
    ForBlocks<Real>(count, [&](auto tag, std::size_t i) HWY_ATTR {
        const auto upper = hn::Mul(hn::Set(tag, rows.weights[0]), hn::LoadU(tag, rows.rows[0] + i));
        const auto value =
            hn::MulAdd(hn::Set(tag, rows.weights[1]), hn::LoadU(tag, rows.rows[1] + i), upper);
        NoteTies(tag, value, StoreRounded(tag, value, out + i), i, ties);
    });
}

/// The vertical pieces of a row: the border's, which is a row itself, and the last one's.
template <class D, typename Real>
HWY_INLINE hn::Vec<D> CubicRows(D tag, const TCubicRows<Real>& rows, std::size_t i) {
    const auto current = hn::LoadU(tag, rows.rows[1] + i);
    auto value = hn::Mul(hn::Set(tag, rows.weights[0]), hn::LoadU(tag, rows.rows[0] + i));
    value = hn::MulAdd(hn::Set(tag, rows.weights[1]), current, value);
    value = hn::MulAdd(hn::Set(tag, rows.weights[2]), hn::LoadU(tag, rows.rows[2] + i), value);
    value = hn::MulAdd(hn::Set(tag, rows.weights[3]), hn::LoadU(tag, rows.rows[3] + i), value);
    value = hn::Min(hn::Max(value, hn::Zero(tag)), hn::Set(tag, rows.limit));
    return hn::MulAdd(hn::Set(tag, rows.end), value, hn::Mul(hn::Set(tag, rows.border), current));
}

template <typename Real>
void MixCubic(const TCubicRows<Real>& rows, std::size_t count, Real* out) {
    ForBlocks<Real>(count, [&](auto tag, std::size_t i)
                               HWY_ATTR { hn::StoreU(CubicRows(tag, rows, i), tag, out + i); });
}

template <typename Real, typename Sample>
void BlendCubic(const TCubicRows<Real>& rows, const Real* weights, const Real* borders,
                std::size_t count, Sample* out, TTieList<Real>& ties) {
    ForBlocks<Real>(count, [&](auto tag, std::size_t i) HWY_ATTR {
        const auto value = hn::MulAdd(CubicRows(tag, rows, i), hn::LoadU(tag, weights + i),
                                      hn::LoadU(tag, borders + i));
        NoteTies(tag, value, StoreRounded(tag, value, out + i), i, ties);
    });
}

void BlendLinear8(const TLinearRows<float>& rows, std::size_t count, std::uint8_t* out,
                  TTieList<float>& ties) {
    BlendLinear(rows, count, out, ties);
}
void BlendLinear16(const TLinearRows<double>& rows, std::size_t count, std::uint16_t* out,
                   TTieList<double>& ties) {
    BlendLinear(rows, count, out, ties);
}
void MixCubic8(const TCubicRows<float>& rows, std::size_t count, float* out) {
    MixCubic(rows, count, out);
}
void MixCubic16(const TCubicRows<double>& rows, std::size_t count, double* out) {
    MixCubic(rows, count, out);
}
void BlendCubic8(const TCubicRows<float>& rows, const float* weights, const float* borders,
                 std::size_t count, std::uint8_t* out, TTieList<float>& ties) {
    BlendCubic(rows, weights, borders, count, out, ties);
}
void BlendCubic16(const TCubicRows<double>& rows, const double* weights, const double* borders,
                  std::size_t count, std::uint16_t* out, TTieList<double>& ties) {
    BlendCubic(rows, weights, borders, count, out, ties);
}

}  // namespace zm::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace zm {

HWY_EXPORT(BlendLinear8);
HWY_EXPORT(BlendLinear16);
HWY_EXPORT(MixCubic8);
HWY_EXPORT(MixCubic16);
HWY_EXPORT(BlendCubic8);
HWY_EXPORT(BlendCubic16);
HWY_EXPORT(PlanSpread8);
HWY_EXPORT(PlanSpread16);
HWY_EXPORT(SpreadOne8);
HWY_EXPORT(SpreadOne16);
HWY_EXPORT(SpreadTwo8);
HWY_EXPORT(SpreadTwo16);
HWY_EXPORT(SpreadCubic8);
HWY_EXPORT(SpreadCubic16);
HWY_EXPORT(SumPixels);
HWY_EXPORT(SumRows8);
HWY_EXPORT(SumRows8Precise);
HWY_EXPORT(SumRows16);

void SumWeightedRows(const TSummedRows<std::uint8_t>& rows, std::size_t count, TSumStart start,
                     float* sums) {
    HWY_DYNAMIC_DISPATCH(SumRows8)(rows, count, start, sums);
}

void SumWeightedRows(const TSummedRows<std::uint8_t, double>& rows, std::size_t count,
                     TSumStart start, double* sums) {
    HWY_DYNAMIC_DISPATCH(SumRows8Precise)(rows, count, start, sums);
}

void SumWeightedRows(const TSummedRows<std::uint16_t>& rows, std::size_t count, TSumStart start,
                     double* sums) {
    HWY_DYNAMIC_DISPATCH(SumRows16)(rows, count, start, sums);
}

void SumPixels3(const TAxisTaps& taps, const float* in, float scale, float* out) {
    HWY_DYNAMIC_DISPATCH(SumPixels)(taps, in, scale, out);
}

template <>
TSpreadPlan MakeSpreadPlan<float>(std::vector<std::int32_t> sources) {
    TSpreadPlan plan{{}, std::move(sources)};
    HWY_DYNAMIC_DISPATCH(PlanSpread8)(plan);
    return plan;
}

template <>
TSpreadPlan MakeSpreadPlan<double>(std::vector<std::int32_t> sources) {
    TSpreadPlan plan{{}, std::move(sources)};
    HWY_DYNAMIC_DISPATCH(PlanSpread16)(plan);
    return plan;
}

void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<float, 1>& row, float* out) {
    HWY_DYNAMIC_DISPATCH(SpreadOne8)(plan, row, out);
}

void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<double, 1>& row, double* out) {
    HWY_DYNAMIC_DISPATCH(SpreadOne16)(plan, row, out);
}

void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<float, 2>& row, float* out) {
    HWY_DYNAMIC_DISPATCH(SpreadTwo8)(plan, row, out);
}

void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<double, 2>& row, double* out) {
    HWY_DYNAMIC_DISPATCH(SpreadTwo16)(plan, row, out);
}

void SpreadCubicRow(const TSpreadPlan& plan, const TSpreadRow<float, 4>& row, float limit,
                    float* out, TTieList<float>& ties) {
    HWY_DYNAMIC_DISPATCH(SpreadCubic8)(plan, row, limit, out, ties);
}

void SpreadCubicRow(const TSpreadPlan& plan, const TSpreadRow<double, 4>& row, double limit,
                    double* out, TTieList<double>& ties) {
    HWY_DYNAMIC_DISPATCH(SpreadCubic16)(plan, row, limit, out, ties);
}

void BlendLinearRows(const TLinearRows<float>& rows, std::size_t count, std::uint8_t* out,
                     TTieList<float>& ties) {
    HWY_DYNAMIC_DISPATCH(BlendLinear8)(rows, count, out, ties);
}

void BlendLinearRows(const TLinearRows<double>& rows, std::size_t count, std::uint16_t* out,
                     TTieList<double>& ties) {
    HWY_DYNAMIC_DISPATCH(BlendLinear16)(rows, count, out, ties);
}

void MixCubicRows(const TCubicRows<float>& rows, std::size_t count, float* out) {
    HWY_DYNAMIC_DISPATCH(MixCubic8)(rows, count, out);
}

void MixCubicRows(const TCubicRows<double>& rows, std::size_t count, double* out) {
    HWY_DYNAMIC_DISPATCH(MixCubic16)(rows, count, out);
}

void BlendCubicRows(const TCubicRows<float>& rows, const float* weights, const float* borders,
                    std::size_t count, std::uint8_t* out, TTieList<float>& ties) {
    HWY_DYNAMIC_DISPATCH(BlendCubic8)(rows, weights, borders, count, out, ties);
}

void BlendCubicRows(const TCubicRows<double>& rows, const double* weights, const double* borders,
                    std::size_t count, std::uint16_t* out, TTieList<double>& ties) {
    HWY_DYNAMIC_DISPATCH(BlendCubic16)(rows, weights, borders, count, out, ties);
}

}  // namespace zm
#endif
