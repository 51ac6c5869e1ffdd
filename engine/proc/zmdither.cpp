#include "engine/proc/zmdither.h"

#include <algorithm>
#include <utility>

#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kRightShare = 7;
constexpr std::int32_t kLowerLeftShare = 3;
constexpr std::int32_t kLowerShare = 5;
constexpr std::int32_t kLowerRightShare = 1;

using TRanks = std::vector<std::int32_t>;

std::int32_t MatrixSize(TZmDitherType type) {
    switch (type) {
        case zmdtOrdered4x4:
        case zmdtSpiral4x4:
        case zmdtDualSpiral4x4: return 4;
        case zmdtOrdered8x8:
        case zmdtSpiral8x8:
        case zmdtDualSpiral8x8: return 8;
        case zmdtOrdered16x16: return 16;
        default: return 0;
    }
}

/// Each bit of x and y, the lowest first, takes the next quarter of the remaining ranks: the
/// same matrix at size 8 as the conversion to one bit uses.
TRanks MakeOrdered(std::int32_t size) {
    constexpr std::int32_t kQuarter[2][2] = {{0, 2}, {3, 1}};
    TRanks ranks;
    for (std::int32_t y = 0; y < size; ++y) {
        for (std::int32_t x = 0; x < size; ++x) {
            std::int32_t rank = 0;
            for (std::int32_t bit = 1; bit < size; bit *= 2) {
                rank = rank * 4 + kQuarter[(x & bit) != 0][(y & bit) != 0];
            }
            ranks.push_back(rank);
        }
    }
    return ranks;
}

/// Places of a square of even size along a spiral that starts at the left upper one of the four in
/// the middle: right, down, left, up, each leg one longer after two.
std::vector<std::pair<std::int32_t, std::int32_t>> SpiralPlaces(std::int32_t size) {
    constexpr std::pair<std::int32_t, std::int32_t> kSteps[4] = {{1, 0}, {0, 1}, {-1, 0}, {0, -1}};
    std::vector<std::pair<std::int32_t, std::int32_t>> places;
    std::int32_t x = size / 2 - 1;
    std::int32_t y = size / 2 - 1;
    const auto cells = static_cast<std::size_t>(size) * static_cast<std::size_t>(size);
    for (std::int32_t leg = 0; places.size() < cells; ++leg) {
        const auto& [step_x, step_y] = kSteps[leg % 4];
        for (std::int32_t i = 0; i < leg / 2 + 1; ++i) {
            if (x >= 0 && x < size && y >= 0 && y < size) {
                places.emplace_back(x, y);
            }
            x += step_x;
            y += step_y;
        }
    }
    return places;
}

TRanks MakeSpiral(std::int32_t size) {
    TRanks ranks(static_cast<std::size_t>(size * size));
    std::int32_t rank = 0;
    for (const auto& [x, y] : SpiralPlaces(size)) {
        ranks[static_cast<std::size_t>(y * size + x)] = rank++;
    }
    return ranks;
}

/// Two quarters, left upper and right lower, fill from their middles outward, in turns; then the
/// other two from their rims inward.
TRanks MakeDualSpiral(std::int32_t size) {
    const std::int32_t half = size / 2;
    const std::int32_t last = size * size - 1;
    TRanks ranks(static_cast<std::size_t>(size * size));
    const auto rank_at = [&](std::int32_t x, std::int32_t y) -> std::int32_t& {
        return ranks[static_cast<std::size_t>(y * size + x)];
    };
    std::int32_t rank = 0;
    for (const auto& [x, y] : SpiralPlaces(half)) {
        rank_at(x, y) = rank;
        rank_at(x + half, y + half) = rank + 1;
        rank_at(x + half, y) = last - rank;
        rank_at(x, y + half) = last - rank - 1;
        rank += 2;
    }
    return ranks;
}

TRanks MakeRanks(TZmDitherType type) {
    const std::int32_t size = MatrixSize(type);
    switch (type) {
        case zmdtOrdered4x4:
        case zmdtOrdered8x8:
        case zmdtOrdered16x16: return MakeOrdered(size);
        case zmdtSpiral4x4:
        case zmdtSpiral8x8: return MakeSpiral(size);
        case zmdtDualSpiral4x4:
        case zmdtDualSpiral8x8: return MakeDualSpiral(size);
        default: return {};
    }
}

/// Sixteenths to a whole number, rounded half up.
std::int32_t FromSixteenths(std::int32_t error) {
    return (error + 8) >> 4;
}

}  // namespace

TDitherMatrix::TDitherMatrix(TZmDitherType type)
    : size_(MatrixSize(type)), ranks_(MakeRanks(type)) {}

TDitherer::TDitherer(const TZmPalette& palette, TFindIndex find, TZmDitherType type,
                     std::int32_t width)
    : palette_(palette),
      find_(std::move(find)),
      matrix_(type),
      is_diffused_(type == zmdtErrorDiffusion),
      width_(width) {
    const std::int32_t cells = matrix_.Cells();
    for (std::int32_t rank = 0; rank < cells; ++rank) {
        // The first pixel to be set is the one that is moved up most.
        auto& offset = offsets_.emplace_back();
        for (std::size_t c = 0; c < offset.size(); ++c) {
            offset[c] = (cells - 1 - 2 * rank) * palette.steps[c] / (2 * cells);
        }
    }
    if (is_diffused_) {
        errors_.resize(static_cast<std::size_t>(width) + 2);
        next_errors_.resize(errors_.size());
    }
}

void TDitherer::MapRow(const TRGB* row, std::uint16_t* indexes) {
    if (is_diffused_) {
        MapDiffused(row, indexes);
    } else if (matrix_.Size() > 0) {
        MapOrdered(row, indexes);
    } else {
        for (std::int32_t x = 0; x < width_; ++x) {
            indexes[x] = static_cast<std::uint16_t>(find_(row[x]));
        }
    }
    ++y_;
}

void TDitherer::MapOrdered(const TRGB* row, std::uint16_t* indexes) {
    for (std::int32_t x = 0; x < width_; ++x) {
        const std::int32_t plain = find_(row[x]);
        if (palette_.colors[static_cast<std::size_t>(plain)] == row[x]) {
            indexes[x] = static_cast<std::uint16_t>(plain);
            continue;
        }
        const auto& offset = offsets_[static_cast<std::size_t>(matrix_.Rank(x, y_))];
        const TRGB moved{Clamp8(row[x].b + offset[2]), Clamp8(row[x].g + offset[1]),
                         Clamp8(row[x].r + offset[0])};
        indexes[x] = static_cast<std::uint16_t>(find_(moved));
    }
}

void TDitherer::MapDiffused(const TRGB* row, std::uint16_t* indexes) {
    std::fill(next_errors_.begin(), next_errors_.end(), std::array<std::int32_t, 3>{});
    for (std::int32_t x = 0; x < width_; ++x) {
        const auto at = static_cast<std::size_t>(x) + 1;
        const auto& error = errors_[at];
        const TRGB wanted{Clamp8(row[x].b + FromSixteenths(error[2])),
                          Clamp8(row[x].g + FromSixteenths(error[1])),
                          Clamp8(row[x].r + FromSixteenths(error[0]))};
        const std::int32_t index = find_(wanted);
        indexes[x] = static_cast<std::uint16_t>(index);
        const TRGB shown = palette_.colors[static_cast<std::size_t>(index)];
        const std::array<std::int32_t, 3> missing{wanted.r - shown.r, wanted.g - shown.g,
                                                  wanted.b - shown.b};
        for (std::size_t c = 0; c < missing.size(); ++c) {
            errors_[at + 1][c] += missing[c] * kRightShare;
            next_errors_[at - 1][c] += missing[c] * kLowerLeftShare;
            next_errors_[at][c] += missing[c] * kLowerShare;
            next_errors_[at + 1][c] += missing[c] * kLowerRightShare;
        }
    }
    std::swap(errors_, next_errors_);
}

TBitDitherer::TBitDitherer(TZmDitherType type, std::int32_t width)
    : matrix_(type), is_diffused_(matrix_.Size() == 0), width_(width) {
    if (is_diffused_) {
        errors_.resize(static_cast<std::size_t>(width) + 2);
        next_errors_.resize(errors_.size());
    }
}

bool TBitDitherer::IsSetDiffused(std::int32_t x, std::int32_t gray) {
    const auto at = static_cast<std::size_t>(x) + 1;
    const std::int32_t wanted = Clamp8(gray + FromSixteenths(errors_[at]));
    const bool is_set = wanted >= 128;
    const std::int32_t missing = wanted - (is_set ? 255 : 0);
    errors_[at + 1] += missing * kRightShare;
    next_errors_[at - 1] += missing * kLowerLeftShare;
    next_errors_[at] += missing * kLowerShare;
    next_errors_[at + 1] += missing * kLowerRightShare;
    return is_set;
}

void TBitDitherer::MapRow(const std::uint8_t* grays, std::uint8_t* bits) {
    std::fill(bits, bits + (static_cast<std::size_t>(width_) + 7) / 8, std::uint8_t{0});
    std::fill(next_errors_.begin(), next_errors_.end(), 0);
    const std::int32_t cells = matrix_.Cells();
    for (std::int32_t x = 0; x < width_; ++x) {
        const bool is_set = is_diffused_
                                ? IsSetDiffused(x, grays[x])
                                : (2 * matrix_.Rank(x, y_) + 1) * 255 < grays[x] * 2 * cells;
        if (is_set) {
            bits[x >> 3] = static_cast<std::uint8_t>(bits[x >> 3] | 0x80 >> (x & 7));
        }
    }
    std::swap(errors_, next_errors_);
    ++y_;
}

}  // namespace zm
