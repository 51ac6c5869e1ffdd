#include "engine/proc/zmpalettes.h"

#include <algorithm>
#include <cmath>

#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::uint32_t kAnswerBits = 12;

/// Levels of red, green and blue; greys have their levels in common.
struct TPaletteGrid {
    std::int32_t red = 0;
    std::int32_t green = 0;
    std::int32_t blue = 0;
    bool is_gray = false;
};

constexpr std::array<TPaletteGrid, kPaletteTypeCount> kGrids{{
    {},
    {2, 2, 2, true},
    {2, 2, 2, false},
    {3, 3, 3, false},
    {4, 4, 4, false},
    {5, 5, 5, false},
    {6, 6, 6, false},
    {6, 7, 6, false},
    {8, 8, 4, false},
    {4, 4, 4, true},
    {16, 16, 16, true},
    {256, 256, 256, true},
}};

std::uint8_t Level(std::int32_t index, std::int32_t count) {
    return Clamp8((index * 510 + count - 1) / (2 * (count - 1)));
}

std::vector<TRGB> MakeGrays(std::int32_t count) {
    std::vector<TRGB> colors;
    for (std::int32_t i = 0; i < count; ++i) {
        const std::uint8_t level = Level(i, count);
        colors.push_back(TRGB{level, level, level});
    }
    return colors;
}

std::vector<TRGB> MakeGrid(const TPaletteGrid& grid) {
    std::vector<TRGB> colors;
    for (std::int32_t r = 0; r < grid.red; ++r) {
        for (std::int32_t g = 0; g < grid.green; ++g) {
            for (std::int32_t b = 0; b < grid.blue; ++b) {
                colors.push_back(
                    TRGB{Level(b, grid.blue), Level(g, grid.green), Level(r, grid.red)});
            }
        }
    }
    return colors;
}

std::int32_t SquaredDistance(TRGB a, TRGB b) {
    const std::int32_t red = a.r - b.r;
    const std::int32_t green = a.g - b.g;
    const std::int32_t blue = a.b - b.b;
    return red * red + green * green + blue * blue;
}

}  // namespace

TZmPalette MakeFixedPalette(TZmPaletteType type) {
    TZmPalette palette;
    if (type == zmptMedianCut || type >= kPaletteTypeCount) {
        return palette;
    }
    const TPaletteGrid& grid = kGrids[type];
    palette.colors = grid.is_gray ? MakeGrays(grid.red) : MakeGrid(grid);
    palette.steps = {255 / (grid.red - 1), 255 / (grid.green - 1), 255 / (grid.blue - 1)};
    return palette;
}

TColorSteps EstimateSteps(std::size_t color_count) {
    const double levels = std::cbrt(static_cast<double>(std::max<std::size_t>(color_count, 1)));
    const std::int32_t step = TruncToInt(255 / levels / 2);
    return {step, step, step};
}

TPaletteFinder::TPaletteFinder(const std::vector<TRGB>& colors)
    : answers_(std::size_t{1} << kAnswerBits) {
    for (const TRGB color : colors) {
        by_green_.push_back({color, static_cast<std::int32_t>(by_green_.size())});
    }
    std::stable_sort(by_green_.begin(), by_green_.end(),
                     [](const TEntry& a, const TEntry& b) { return a.color.g < b.color.g; });
}

std::int32_t TPaletteFinder::Find(TRGB color) {
    const auto key = static_cast<std::uint32_t>(color.b | color.g << 8 | color.r << 16);
    TAnswer& answer = answers_[(key * 2654435761u) >> (32 - kAnswerBits)];
    if (answer.key != key) {
        answer = {key, Search(color)};
    }
    return answer.index;
}

/// Outward from the colour's green, on both sides, until green alone is too far away.
std::int32_t TPaletteFinder::Search(TRGB color) const {
    const auto middle = std::lower_bound(
        by_green_.begin(), by_green_.end(), color.g,
        [](const TEntry& entry, std::uint8_t green) { return entry.color.g < green; });
    std::int32_t best = kMaxInt32;
    std::int32_t index = 0;
    // False when entries further on cannot be nearer.
    const auto look_at = [&](const TEntry& entry) {
        const std::int32_t green = entry.color.g - color.g;
        if (green * green > best) {
            return false;
        }
        const std::int32_t distance = SquaredDistance(entry.color, color);
        if (distance < best || (distance == best && entry.index < index)) {
            best = distance;
            index = entry.index;
        }
        return true;
    };
    for (auto up = middle; up != by_green_.end() && look_at(*up); ++up) {
    }
    for (auto down = middle; down != by_green_.begin() && look_at(*(down - 1)); --down) {
    }
    return index;
}

}  // namespace zm
