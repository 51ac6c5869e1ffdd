#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/proc/zmpalettes.h"

/// Ways to spread what a palette cannot show over neighbouring pixels.
namespace zm {

enum TZmDitherType : std::uint8_t {
    zmdtSolid,       ///< none
    zmdtOrdered4x4,  ///< dispersed dots
    zmdtOrdered8x8,
    zmdtOrdered16x16,
    zmdtSpiral4x4,  ///< a dot that grows from the middle of each cell
    zmdtSpiral8x8,
    zmdtDualSpiral4x4,  ///< dots that grow in one half of the cell, holes that close in the other
    zmdtDualSpiral8x8,
    zmdtErrorDiffusion,  ///< errors go to the pixels that follow, 7 3 5 1 sixteenths
};
inline constexpr int kDitherTypeCount = 9;

/// A square of threshold ranks: each of 0 to Cells() - 1 once, in the order in which pixels of a
/// rising grey are set. Without cells for zmdtSolid and zmdtErrorDiffusion.
class TDitherMatrix {
public:
    explicit TDitherMatrix(TZmDitherType type);
    std::int32_t Size() const { return size_; }
    std::int32_t Cells() const { return size_ * size_; }
    /// Rank for a place of the image.
    std::int32_t Rank(std::int32_t x, std::int32_t y) const {
        return ranks_[static_cast<std::size_t>((y % size_) * size_ + x % size_)];
    }

private:
    std::int32_t size_ = 0;
    std::vector<std::int32_t> ranks_;
};

/// Maps rows of colours to palette indexes, from the top row of an image down. Matrices leave
/// colours alone that the palette has.
class TDitherer {
public:
    using TFindIndex = std::function<std::int32_t(TRGB)>;
    /// `find` gives the index of a colour, inside the palette.
    TDitherer(const TZmPalette& palette, TFindIndex find, TZmDitherType type, std::int32_t width);
    /// Indexes of the next row.
    void MapRow(const TRGB* row, std::uint16_t* indexes);

private:
    void MapOrdered(const TRGB* row, std::uint16_t* indexes);
    void MapDiffused(const TRGB* row, std::uint16_t* indexes);

    const TZmPalette& palette_;
    TFindIndex find_;
    TDitherMatrix matrix_;
    bool is_diffused_;
    std::int32_t width_;
    std::int32_t y_ = 0;
    std::vector<std::array<std::int32_t, 3>> offsets_;  // by rank: red, green, blue
    // Sixteenths of errors that this row and the next take, a pixel more at both ends.
    std::vector<std::array<std::int32_t, 3>> errors_;
    std::vector<std::array<std::int32_t, 3>> next_errors_;
};

/// Maps rows of greys to rows of one bit; white sets every bit and black none.
class TBitDitherer {
public:
    TBitDitherer(TZmDitherType type, std::int32_t width);
    /// The next row; unused bits of the last byte become 0.
    void MapRow(const std::uint8_t* grays, std::uint8_t* bits);

private:
    bool IsSetDiffused(std::int32_t x, std::int32_t gray);

    TDitherMatrix matrix_;
    bool is_diffused_;
    std::int32_t width_;
    std::int32_t y_ = 0;
    std::vector<std::int32_t> errors_;
    std::vector<std::int32_t> next_errors_;
};

}  // namespace zm
