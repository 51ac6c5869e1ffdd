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
/// The cubic, limited to 0 .. limit, in the stated order of operations.
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

/// out = rounded mixture of the rows; true when a sample lies further than `tie_start` from its
/// integer. Writes `count` samples exactly.
bool BlendLinearRows(const TLinearRows<float>& rows, std::size_t count, std::uint8_t* out,
                     float tie_start);
bool BlendLinearRows(const TLinearRows<double>& rows, std::size_t count, std::uint16_t* out,
                     double tie_start);
/// out = mixture of the rows.
void MixCubicRows(const TCubicRows<float>& rows, std::size_t count, float* out);
void MixCubicRows(const TCubicRows<double>& rows, std::size_t count, double* out);
/// out = rounded mixture of the rows times `weights`, plus `borders`; true as above.
bool BlendCubicRows(const TCubicRows<float>& rows, const float* weights, const float* borders,
                    std::size_t count, std::uint8_t* out, float tie_start);
bool BlendCubicRows(const TCubicRows<double>& rows, const double* weights, const double* borders,
                    std::size_t count, std::uint16_t* out, double tie_start);

/// The fast forms by direction. False when they are not precise enough here, and then nothing
/// has been written.
[[nodiscard]] bool ShrinkAreaFast(TZmBitmap& source, TZmBitmap& target,
                                  const TResampleListener& listener);
[[nodiscard]] bool EnlargeAreaFast(TZmBitmap& source, TZmBitmap& target,
                                   TAreaInterpolation interpolation,
                                   const TResampleListener& listener);

}  // namespace zm
