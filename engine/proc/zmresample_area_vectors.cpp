// Vector loops of the area engine's enlarging: target rows as mixtures of filtered rows.

#include <cstddef>

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

/// Keeps the largest distance of a value from its rounded one.
template <typename Real>
class TDistanceMeter {
public:
    template <class D>
    HWY_INLINE void Note(D tag, hn::Vec<D> value, hn::Vec<D> rounded) {
        const auto distance = hn::Abs(hn::Sub(value, rounded));
        const auto limit = hn::Set(tag, limit_);
        seen_ |= !hn::AllFalse(tag, hn::Gt(distance, limit));
    }
    explicit TDistanceMeter(Real limit) : limit_(limit) {}
    bool Seen() const { return seen_; }

private:
    Real limit_;
    bool seen_ = false;
};

template <typename Real, typename Sample>
bool BlendLinear(const TLinearRows<Real>& rows, std::size_t count, Sample* out, Real tie_start) {
    TDistanceMeter<Real> meter(tie_start);
    ForBlocks<Real>(count, [&](auto tag, std::size_t i) HWY_ATTR {
        const auto upper = hn::Mul(hn::Set(tag, rows.weights[0]), hn::LoadU(tag, rows.rows[0] + i));
        const auto value =
            hn::MulAdd(hn::Set(tag, rows.weights[1]), hn::LoadU(tag, rows.rows[1] + i), upper);
        meter.Note(tag, value, StoreRounded(tag, value, out + i));
    });
    return meter.Seen();
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
bool BlendCubic(const TCubicRows<Real>& rows, const Real* weights, const Real* borders,
                std::size_t count, Sample* out, Real tie_start) {
    TDistanceMeter<Real> meter(tie_start);
    ForBlocks<Real>(count, [&](auto tag, std::size_t i) HWY_ATTR {
        const auto value = hn::MulAdd(CubicRows(tag, rows, i), hn::LoadU(tag, weights + i),
                                      hn::LoadU(tag, borders + i));
        meter.Note(tag, value, StoreRounded(tag, value, out + i));
    });
    return meter.Seen();
}

bool BlendLinear8(const TLinearRows<float>& rows, std::size_t count, std::uint8_t* out,
                  float tie_start) {
    return BlendLinear(rows, count, out, tie_start);
}
bool BlendLinear16(const TLinearRows<double>& rows, std::size_t count, std::uint16_t* out,
                   double tie_start) {
    return BlendLinear(rows, count, out, tie_start);
}
void MixCubic8(const TCubicRows<float>& rows, std::size_t count, float* out) {
    MixCubic(rows, count, out);
}
void MixCubic16(const TCubicRows<double>& rows, std::size_t count, double* out) {
    MixCubic(rows, count, out);
}
bool BlendCubic8(const TCubicRows<float>& rows, const float* weights, const float* borders,
                 std::size_t count, std::uint8_t* out, float tie_start) {
    return BlendCubic(rows, weights, borders, count, out, tie_start);
}
bool BlendCubic16(const TCubicRows<double>& rows, const double* weights, const double* borders,
                  std::size_t count, std::uint16_t* out, double tie_start) {
    return BlendCubic(rows, weights, borders, count, out, tie_start);
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

bool BlendLinearRows(const TLinearRows<float>& rows, std::size_t count, std::uint8_t* out,
                     float tie_start) {
    return HWY_DYNAMIC_DISPATCH(BlendLinear8)(rows, count, out, tie_start);
}

bool BlendLinearRows(const TLinearRows<double>& rows, std::size_t count, std::uint16_t* out,
                     double tie_start) {
    return HWY_DYNAMIC_DISPATCH(BlendLinear16)(rows, count, out, tie_start);
}

void MixCubicRows(const TCubicRows<float>& rows, std::size_t count, float* out) {
    HWY_DYNAMIC_DISPATCH(MixCubic8)(rows, count, out);
}

void MixCubicRows(const TCubicRows<double>& rows, std::size_t count, double* out) {
    HWY_DYNAMIC_DISPATCH(MixCubic16)(rows, count, out);
}

bool BlendCubicRows(const TCubicRows<float>& rows, const float* weights, const float* borders,
                    std::size_t count, std::uint8_t* out, float tie_start) {
    return HWY_DYNAMIC_DISPATCH(BlendCubic8)(rows, weights, borders, count, out, tie_start);
}

bool BlendCubicRows(const TCubicRows<double>& rows, const double* weights, const double* borders,
                    std::size_t count, std::uint16_t* out, double tie_start) {
    return HWY_DYNAMIC_DISPATCH(BlendCubic16)(rows, weights, borders, count, out, tie_start);
}

}  // namespace zm
#endif
