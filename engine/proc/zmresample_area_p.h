#pragma once

#include <cstdint>
#include <vector>

#include "engine/proc/zmresample_p.h"

/// What the plain and the fast form of the area engine share: the walks that cut the footprints
/// of the target pixels into pieces at every source pixel border.
namespace zm {

/// Slack of the border tests: keeps rounding noise from making a piece where a target border and
/// a source border fall together.
inline constexpr double kAreaBorderSlack = 0.0001;

/// One step of a walk along an axis.
struct TAreaStep {
    double position = 0;       ///< after the step, in source pixels
    std::int32_t index = 0;    ///< source pixel that the step lies in
    bool ends_pixel = false;   ///< the step ends its target pixel; otherwise it ends `index`
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
std::vector<double> MakeAreaPieces(double step, std::int32_t source_size,
                                   std::int32_t target_size);

}  // namespace zm
