#pragma once

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <utility>

namespace zm {

/// The ellipse of a rectangle of `width` x `height` pixels: of a row, those columns belong to it
/// whose centres lie inside.
struct TZmEllipse {
    double width = 0;
    double height = 0;

    /// First column and number of columns of row `y`, counted from the rectangle's corner.
    std::pair<std::int64_t, std::int64_t> RowSpan(std::int64_t y) const {
        const double distance = (static_cast<double>(y) + 0.5) / height * 2.0 - 1.0;
        const double half = std::sqrt(std::max(0.0, 1.0 - distance * distance)) * width / 2.0;
        const auto first = static_cast<std::int64_t>(std::ceil(width / 2.0 - half - 0.5));
        const auto last = static_cast<std::int64_t>(std::floor(width / 2.0 + half - 0.5));
        return {first, last - first + 1};
    }
};

}  // namespace zm
