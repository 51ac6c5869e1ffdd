#pragma once

#include <array>
#include <cstdint>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// Palettes that conversions to few colours offer, and the search for the entry of a colour.
namespace zm {

/// How a palette comes about: from the image, or as a fixed grid of channel levels.
enum TZmPaletteType : std::uint8_t {
    zmptMedianCut,         ///< found for the image by TZmQuantizer
    zmptFixedBW,           ///< black and white
    zmptFixedHalftone8,    ///< 2 levels a channel
    zmptFixedHalftone27,   ///< 3 levels
    zmptFixedHalftone64,   ///< 4 levels
    zmptFixedHalftone125,  ///< 5 levels
    zmptFixedWebPalette,   ///< 6 levels: multiples of 51
    zmptFixedHalftone252,  ///< 6 levels of red, 7 of green, 6 of blue
    zmptFixedHalftone256,  ///< 8 levels of red and green, 4 of blue
    zmptFixedGray4,        ///< even greys
    zmptFixedGray16,
    zmptFixedGray256,
};
inline constexpr int kPaletteTypeCount = 12;

/// Distances between neighbouring colours, for red, green and blue: how far dithering may move
/// a colour.
using TColorSteps = std::array<std::int32_t, 3>;

struct TZmPalette {
    std::vector<TRGB> colors;
    TColorSteps steps{};
};

/// The entries of a fixed palette: blue runs fastest, red slowest; level i of n is i * 255 /
/// (n - 1), rounded. Empty for zmptMedianCut and unknown types.
TZmPalette MakeFixedPalette(TZmPaletteType type);

/// Steps for a palette without a grid: half of what an even grid of that many colours had.
TColorSteps EstimateSteps(std::size_t color_count);

/// Finds the entry nearest to a colour by the sum of squared channel differences; of equally near
/// entries the first. Remembers answers: not thread-safe.
class TPaletteFinder {
public:
    /// `colors` has 1 to 65536 entries.
    explicit TPaletteFinder(const std::vector<TRGB>& colors);
    std::int32_t Find(TRGB color);

private:
    struct TEntry {
        TRGB color;
        std::int32_t index = 0;
    };
    struct TAnswer {
        std::uint32_t key = 0xFFFFFFFF;
        std::int32_t index = 0;
    };
    std::int32_t Search(TRGB color) const;

    std::vector<TEntry> by_green_;
    std::vector<TAnswer> answers_;
};

}  // namespace zm
