// Exact copies of an image turned by whole quarters. The plain form goes sample by sample; the
// fast one by blocks of source rows that stay in the cache while their columns become rows.

#include <algorithm>
#include <array>
#include <cstring>

#include "engine/proc/zmrotate_p.h"

namespace zm {
namespace {

/// Source rows of a block: their lines and those of the target fit the cache together.
constexpr std::int32_t kBlockRows = 64;
/// Columns that vectors turn together, and those that they read.
constexpr std::int32_t kVectorColumns = 4;
constexpr std::int32_t kVectorReach = 6;

bool AllocateTurned(TZmBitmap& source, TZmBitmap& target, TQuarterTurns turns) {
    const bool is_swapped = turns != 2;
    const std::int32_t width = is_swapped ? source.GetHeight() : source.GetWidth();
    const std::int32_t height = is_swapped ? source.GetWidth() : source.GetHeight();
    if (!target.Allocate(width, height, source.GetPixelFormat()) ||
        target.GetPixelFormat() != source.GetPixelFormat()) {
        return false;
    }
    if (source.GetPixelFormat() == zm8p) {
        source.CopyPaletteTo(&target);
    }
    return true;
}

// Plain.

bool GetBit(const std::uint8_t* row, std::int32_t x) {
    return (row[x >> 3] >> (7 - (x & 7)) & 1) != 0;
}

void SetBit(std::uint8_t* row, std::int32_t x) {
    row[x >> 3] = static_cast<std::uint8_t>(row[x >> 3] | 0x80 >> (x & 7));
}

void CopySample(const std::uint8_t* from, std::int32_t from_x, std::uint8_t* to, std::int32_t to_x,
                std::int32_t bit_count) {
    if (bit_count == 1) {
        if (GetBit(from, from_x)) {
            SetBit(to, to_x);
        }
        return;
    }
    const std::int64_t bytes = bit_count / 8;
    std::memcpy(to + to_x * bytes, from + from_x * bytes, static_cast<std::size_t>(bytes));
}

// Blocks.

/// Writes column `column` of `count` rows as a line of pixels of N bytes.
template <std::size_t N>
void GatherColumn(const std::uint8_t* const* rows, std::int32_t count, std::size_t column,
                  std::uint8_t* out) {
    const std::size_t offset = column * N;
    for (std::int32_t i = 0; i < count; ++i, out += N) {
        std::memcpy(out, rows[i] + offset, N);
    }
}

/// Pixels of three bytes as four, the last byte being overwritten by the next pixel. `column` is
/// not the last of the image, so that the fourth byte lies inside the row.
void GatherColumn24(const std::uint8_t* const* rows, std::int32_t count, std::size_t column,
                    std::uint8_t* out) {
    const std::size_t offset = column * 3;
    for (std::int32_t i = 0; i < count - 1; ++i, out += 3) {
        std::memcpy(out, rows[i] + offset, 4);
    }
    std::memcpy(out, rows[count - 1] + offset, 3);
}

using TGatherFunction = void (*)(const std::uint8_t* const* rows, std::int32_t count,
                                 std::size_t column, std::uint8_t* out);

TGatherFunction GatherFunctionFor(std::int32_t bit_count) {
    switch (bit_count) {
        case 8: return GatherColumn<1>;
        case 16: return GatherColumn<2>;
        case 24: return GatherColumn24;
        case 32: return GatherColumn<4>;
        default: return GatherColumn<6>;
    }
}

/// Turns 8 rows of 8 bits, most significant leftmost, into 8 columns: bit x of byte y becomes
/// bit y of byte x. Three rounds of exchanging ever larger squares.
std::uint64_t TransposeBits(std::uint64_t bits) {
    std::uint64_t swap = (bits ^ (bits >> 7)) & 0x00AA00AA00AA00AAu;
    bits ^= swap ^ (swap << 7);
    swap = (bits ^ (bits >> 14)) & 0x0000CCCC0000CCCCu;
    bits ^= swap ^ (swap << 14);
    swap = (bits ^ (bits >> 28)) & 0x00000000F0F0F0F0u;
    return bits ^ swap ^ (swap << 28);
}

/// Copies blocks of a quarter turn. Rows of the source become columns of the target; `is_left`
/// turns counter-clockwise.
class TQuarterTurner {
public:
    TQuarterTurner(TZmBitmap& source, TZmBitmap& target, bool is_left)
        : source_(source),
          target_(target),
          is_left_(is_left),
          width_(source.GetWidth()),
          height_(source.GetHeight()),
          rows_(source) {}

    void Run() {
        const bool is_bits = source_.GetBitCount() == 1;
        // A target in a file is visited as rarely as the copies of source rows allow.
        const std::int32_t block = rows_.IsDirect() ? kBlockRows : std::max(rows_.Capacity(), 1);
        const std::int32_t step = is_bits && block >= 8 ? block / 8 * 8 : block;
        for (std::int32_t x = 0; x < height_; x += step) {
            LoadBlock(x, std::min(step, height_ - x));
            if (is_bits) {
                TurnBits(x);
            } else {
                TurnSamples(x);
            }
        }
    }

private:
    /// Source row that becomes column `x` of the target.
    std::int32_t SourceRow(std::int32_t x) const { return is_left_ ? x : height_ - 1 - x; }
    /// Target row that source column `column` becomes.
    std::int32_t TargetRow(std::int32_t column) const {
        return is_left_ ? width_ - 1 - column : column;
    }

    /// The source rows of `count` target columns from `first` on, in the target's order.
    void LoadBlock(std::int32_t first, std::int32_t count) {
        const std::int32_t one = SourceRow(first);
        const std::int32_t other = SourceRow(first + count - 1);
        rows_.Require(std::min(one, other), std::max(one, other));
        block_.resize(static_cast<std::size_t>(count));
        for (std::int32_t i = 0; i < count; ++i) {
            block_[static_cast<std::size_t>(i)] =
                rows_.Table()[static_cast<std::size_t>(SourceRow(first + i))];
        }
    }

    void TurnSamples(std::int32_t first) {
        const std::int32_t bit_count = source_.GetBitCount();
        const std::int64_t offset = std::int64_t{first} * (bit_count / 8);
        const TGatherFunction gather = GatherFunctionFor(bit_count);
        std::int32_t column = 0;
        if (bit_count == 24 && target_.GetLocation() != zmFile) {
            for (; column <= width_ - kVectorReach; column += kVectorColumns) {
                TurnFourColumns(first, column);
            }
        }
        for (; column < width_; ++column) {
            const bool is_last = column == width_ - 1;
            const TGatherFunction chosen = is_last && bit_count == 24 ? GatherColumn<3> : gather;
            chosen(block_.data(), static_cast<std::int32_t>(block_.size()),
                   static_cast<std::size_t>(column),
                   target_.GetScanLine(TargetRow(column)) + offset);
        }
    }

    /// Three-byte pixels of four columns; all four target rows are at hand.
    void TurnFourColumns(std::int32_t first, std::int32_t column) {
        std::array<std::uint8_t*, kVectorColumns> lines;
        for (std::int32_t i = 0; i < kVectorColumns; ++i) {
            lines[static_cast<std::size_t>(i)] =
                target_.GetScanLine(TargetRow(column + i)) + std::int64_t{first} * 3;
        }
        // The last two pixels of a target row give the room behind a block.
        const auto count = static_cast<std::int32_t>(block_.size());
        const std::int32_t roomy = std::min(count, height_ - first - 2);
        const auto from = static_cast<std::size_t>(column);
        const std::int32_t done =
            roomy > 0 ? TurnColumns24(block_.data(), roomy, from, lines.data()) : 0;
        for (std::size_t i = 0; i < lines.size() && done < count; ++i) {
            GatherColumn24(block_.data() + done, count - done, from + i,
                           lines[i] + std::int64_t{done} * 3);
        }
    }

    /// `first` is a multiple of 8.
    void TurnBits(std::int32_t first) {
        for (std::int32_t column = 0; column < width_; column += 8) {
            const std::int32_t columns = std::min(8, width_ - column);
            const auto groups = (block_.size() + 7) / 8;
            squares_.resize(groups);
            for (std::size_t group = 0; group < groups; ++group) {
                squares_[group] = TransposeBits(GatherSquare(group * 8, column >> 3));
            }
            for (std::int32_t i = 0; i < columns; ++i) {
                std::uint8_t* out = target_.GetScanLine(TargetRow(column + i)) + first / 8;
                for (const std::uint64_t square : squares_) {
                    *out++ = static_cast<std::uint8_t>(square >> (56 - 8 * i));
                }
            }
        }
    }

    /// Byte `byte` of eight rows, the first one on top; missing rows are 0.
    std::uint64_t GatherSquare(std::size_t first, std::int32_t byte) const {
        std::uint64_t bits = 0;
        for (std::size_t i = first; i < first + 8; ++i) {
            bits = bits << 8 | (i < block_.size() ? block_[i][byte] : 0u);
        }
        return bits;
    }

    TZmBitmap& source_;
    TZmBitmap& target_;
    bool is_left_;
    std::int32_t width_;
    std::int32_t height_;
    TSourceRows rows_;
    std::vector<const std::uint8_t*> block_;
    std::vector<std::uint64_t> squares_;
};

void TurnHalf(TZmBitmap& source, TZmBitmap& target) {
    const std::int32_t height = source.GetHeight();
    for (std::int32_t y = 0; y < height; ++y) {
        ReverseRow(source.GetScanLine(height - 1 - y), source.GetWidth(), source.GetBitCount(),
                   target.GetScanLine(y));
    }
}

}  // namespace

bool TurnQuartersPlain(TZmBitmap& source, TZmBitmap& target, TQuarterTurns turns) {
    if (!AllocateTurned(source, target, turns)) {
        return false;
    }
    const std::int32_t width = source.GetWidth();
    const std::int32_t height = source.GetHeight();
    for (std::int32_t y = 0; y < target.GetHeight(); ++y) {
        std::uint8_t* const out = target.GetScanLine(y);
        std::memset(out, 0, PixelBytes(target));
        for (std::int32_t x = 0; x < target.GetWidth(); ++x) {
            const std::int32_t from_x = turns == 1 ? width - 1 - y : turns == 2 ? width - 1 - x : y;
            const std::int32_t from_y = turns == 1   ? x
                                        : turns == 2 ? height - 1 - y
                                                     : height - 1 - x;
            CopySample(source.GetScanLine(from_y), from_x, out, x, source.GetBitCount());
        }
    }
    return true;
}

bool TurnQuarters(TZmBitmap& source, TZmBitmap& target, TQuarterTurns turns) {
    if (!AllocateTurned(source, target, turns)) {
        return false;
    }
    const TAccessGuard reading(source, zmdRead);
    if (turns == 2) {
        const TAccessGuard writing(target, zmdWrite);
        TurnHalf(source, target);
    } else {
        TQuarterTurner(source, target, /*is_left=*/turns == 1).Run();
    }
    return true;
}

}  // namespace zm
