#pragma once

#include <cstdint>

/// Choices that operations of bitmaps take.
namespace zm {

/// The way of a gradient, from its start value to its end value.
enum TZmGradientDirection : std::uint8_t {
    zmgHorizontal,  ///< left to right
    zmgVertical,    ///< top to bottom
    zmgDiagonal,    ///< top left to bottom right, equal along x + y
    zmgDiagonal2,   ///< top right to bottom left
};

/// How alpha values `s` are merged into others, `d`, at a rate.
enum TZmAlphaMergeMode : std::uint8_t {
    zmaAdd,       ///< d + s * rate
    zmaSubtract,  ///< d - s * rate
    zmaSet,       ///< s * rate
};

/// Where a picture goes on a canvas of another size.
enum TZmHorizAlign : std::uint8_t { zmhLeft, zmhCenter, zmhRight };
enum TZmVertAlign : std::uint8_t { zmvTop, zmvCenter, zmvBottom };

}  // namespace zm
