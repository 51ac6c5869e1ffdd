#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <vector>

#include "engine/proc/zmresample_p.h"

/// What the plain and the fast forms of the area engine share: the walks that cut the footprints
/// of the target pixels into pieces at every source pixel border, and the cubic.
namespace zm {

/// Slack of the border tests: keeps rounding noise from making a piece where a target border and
/// a source border fall together.
inline constexpr double kAreaBorderSlack = 0.0001;

/// One step of a walk along an axis.
struct TAreaStep {
    double position = 0;      ///< after the step, in source pixels
    std::int32_t index = 0;   ///< source pixel that the step lies in
    bool ends_pixel = false;  ///< the step ends its target pixel; otherwise it ends `index`
};

/// Walks one axis: each call gives the next piece's end. A step that ends no target pixel is
/// followed by the next source pixel; the last source pixel is never left, whatever rounding has
/// done to the position.
class TAreaWalk {
public:
    TAreaWalk(double step, std::int32_t source_size) : step_(step), last_(source_size - 1) {}
    TAreaStep Next() {
        const double target_end = position_ + step_;
        const std::int32_t index = index_;
        if (index == last_ || !(target_end > index + 1 + kAreaBorderSlack)) {
            position_ = target_end;
            return TAreaStep{position_, index, true};
        }
        ++index_;
        return TAreaStep{static_cast<double>(index_), index, false};
    }

private:
    double step_;
    std::int32_t last_;
    double position_ = 0;
    std::int32_t index_ = 0;
};

/// Lengths of the horizontal pieces in the order of the walk, target_size + source_size entries.
/// Each is taken from the sum of those before it, so that the lengths' sum has no drift.
std::vector<double> MakeAreaPieces(double step, std::int32_t source_size, std::int32_t target_size);

/// Margins around a tie beyond this would leave too many pixels to the slow way.
inline constexpr double kMaxTieMargin = 0.01;
/// The arithmetic of the fast forms: single precision for bytes, double for 16-bit samples.
template <typename Sample>
using TAreaReal = std::conditional_t<std::is_same_v<Sample, std::uint8_t>, float, double>;

/// Weights of the four-point cubic with parameter -1 at `t` between the second and third point.
std::array<double, 4> CubicWeights(double t);
/// Four samples by their weights, limited to 0 .. limit, in the stated order of operations.
inline double MixCubic(const std::array<double, 4>& samples, const std::array<double, 4>& weights,
                       double limit) {
    const double value = samples[0] * weights[0] + samples[1] * weights[1] +
                         samples[2] * weights[2] + samples[3] * weights[3];
    return value < 0 ? 0 : value > limit ? limit : value;
}
/// The cubic at `t`, limited.
double LimitedCubic(double a, double b, double c, double d, double t, double limit);

/// Two filtered rows and their weights in a target row.
template <typename Real>
struct TLinearRows {
    std::array<const Real*, 2> rows;
    std::array<Real, 2> weights;
};
/// Four filtered rows, their weights in the cubic, its limit, and the weights of the cubic and
/// of the second row alone (the piece at the border before it) in a target row.
template <typename Real>
struct TCubicRows {
    std::array<const Real*, 4> rows;
    std::array<Real, 4> weights;
    Real limit;
    Real end;
    Real border;
};

/// Numbers behind the end that the vector loops below may read or write.
inline constexpr std::size_t kAreaPadding = 64;

/// Where each sample of a filtered row comes from: for whole vectors of samples a place in the
/// source row, and for each sample its distance from there. Enlarging moves by one sample or
/// back to the start of a pixel, so that a vector of four samples or more comes from one vector of
/// the source.
struct TSpreadPlan {
    std::vector<std::int32_t> bases;
    std::vector<std::int32_t> offsets;  ///< padded to whole vectors
};
/// Plans rows whose sample i comes from sample `sources`[i], for the arithmetic of `Real`.
template <typename Real>
TSpreadPlan MakeSpreadPlan(std::vector<std::int32_t> sources);

/// A source row, the distance of neighbouring pixels in it, and for each tap (pixels side by
/// side, from the planned one on) the weights of all samples. Padded, all of them.
template <typename Real, std::size_t kTaps>
struct TSpreadRow {
    const Real* samples;
    std::size_t step;
    std::array<const Real*, kTaps> weights;
};
/// out = sums of the taps.
void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<float, 1>& row, float* out);
void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<double, 1>& row, double* out);
void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<float, 2>& row, float* out);
void SpreadRow(const TSpreadPlan& plan, const TSpreadRow<double, 2>& row, double* out);

/// Where results near a tie are noted. Those further than `start` from their integer are; the
/// list has room for all samples of a call.
template <typename Real>
struct TTieList {
    Real start;
    std::uint32_t* samples;
    std::size_t count = 0;
};
/// out = sums of the taps, limited to 0 .. `limit` and rounded. Notes samples, also some of the
/// padding.
void SpreadCubicRow(const TSpreadPlan& plan, const TSpreadRow<float, 4>& row, float limit,
                    float* out, TTieList<float>& ties);
void SpreadCubicRow(const TSpreadPlan& plan, const TSpreadRow<double, 4>& row, double limit,
                    double* out, TTieList<double>& ties);

/// out = rounded mixture of the rows. Writes `count` samples exactly; notes samples.
void BlendLinearRows(const TLinearRows<float>& rows, std::size_t count, std::uint8_t* out,
                     TTieList<float>& ties);
void BlendLinearRows(const TLinearRows<double>& rows, std::size_t count, std::uint16_t* out,
                     TTieList<double>& ties);
/// out = mixture of the rows.
void MixCubicRows(const TCubicRows<float>& rows, std::size_t count, float* out);
void MixCubicRows(const TCubicRows<double>& rows, std::size_t count, double* out);
/// out = rounded mixture of the rows times `weights`, plus `borders`; as BlendLinearRows.
void BlendCubicRows(const TCubicRows<float>& rows, const float* weights, const float* borders,
                    std::size_t count, std::uint8_t* out, TTieList<float>& ties);
void BlendCubicRows(const TCubicRows<double>& rows, const double* weights, const double* borders,
                    std::size_t count, std::uint16_t* out, TTieList<double>& ties);

/// A source pixel's share in a target pixel along an axis.
template <typename Real>
struct TAxisTap {
    std::int32_t index = 0;
    Real weight = 0;
};

/// Whether sums start at 0 or are added to.
enum class TSumStart : std::uint8_t { kFresh, kGoOn };
/// Rows of samples with their weights.
template <typename Sample, typename Real = TAreaReal<Sample>>
struct TSummedRows {
    const Sample* const* rows;
    const Real* weights;
    std::size_t row_count;
};
/// sums[i] = (or +=) the rows' samples times their weights.
void SumWeightedRows(const TSummedRows<std::uint8_t>& rows, std::size_t count, TSumStart start,
                     float* sums);
void SumWeightedRows(const TSummedRows<std::uint8_t, double>& rows, std::size_t count,
                     TSumStart start, double* sums);
void SumWeightedRows(const TSummedRows<std::uint16_t>& rows, std::size_t count, TSumStart start,
                     double* sums);

/// The taps of target pixels: those of pixel x from starts[x] up to starts[x + 1].
struct TAxisTaps {
    const TAxisTap<float>* taps;
    const std::size_t* starts;
    std::size_t count;
};
/// Sums of three-channel pixels, times `scale`. Reads one number behind the last pixel of `in`
/// and writes one behind the last of `out`.
void SumPixels3(const TAxisTaps& taps, const float* in, float scale, float* out);

/// The fast forms by direction. False when they are not precise enough here, and then nothing
/// has been written.
[[nodiscard]] bool ShrinkAreaFast(TZmBitmap& source, TZmBitmap& target,
                                  const TResampleListener& listener);
[[nodiscard]] bool EnlargeAreaFast(TZmBitmap& source, TZmBitmap& target, TZmBitmap* alpha,
                                   TAreaInterpolation interpolation,
                                   const TResampleListener& listener);
/// One side shrinks, the other enlarges; always precise.
[[nodiscard]] bool MixAreaFast(TZmBitmap& source, TZmBitmap& target,
                               TAreaInterpolation interpolation, const TResampleListener& listener);

/// Whether all values of a plane are 255.
bool IsOpaquePlane(TZmBitmap& alpha);
/// Which of four pixels (here, right, below, below right: 0 to 3) has the colour to use where
/// their alpha differs: the last whose alpha is above that of some other; -1 when all are equal.
/// Alpha bytes compare as their fractions of 255 do.
int StrongestAlpha(const std::array<std::uint8_t, 4>& alpha);

}  // namespace zm
