/// Soft edges of the alpha plane: values fade with their distance to the transparent pixels.
///
/// Distances lie in a 16-bit bitmap beside the plane, which goes to disk by itself when the plane
/// is large. One pass goes down, one up, and the second fades each row as soon as its distances
/// are final. Distances from `limit` on are all the same: they fade nothing.

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kLargestDepth = 65533;

using TDistances = std::vector<std::int32_t>;

void LoadDistances(TZmBitmap& store, std::int32_t y, TDistances& row) {
    const std::uint8_t* address = store.GetScanLine(y);
    for (std::int32_t& distance : row) {
        std::uint16_t word;
        std::memcpy(&word, address, sizeof word);
        address += sizeof word;
        distance = word;
    }
}

void StoreDistances(TZmBitmap& store, std::int32_t y, const TDistances& row) {
    std::uint8_t* address = store.GetScanLine(y);
    for (const std::int32_t distance : row) {
        const auto word = static_cast<std::uint16_t>(distance);
        std::memcpy(address, &word, sizeof word);
        address += sizeof word;
    }
}

/// One more than the distances of a finished row above or below.
void StepFromRow(const TDistances& finished, TDistances& row) {
    for (std::size_t x = 0; x < row.size(); ++x) {
        row[x] = std::min(row[x], finished[x] + 1);
    }
}

/// The same to the eight neighbours, in both directions along the row as well.
void StepToNeighbours(const TDistances& finished, TDistances& row) {
    const std::size_t last = row.size() - 1;
    for (std::size_t x = 0; x <= last; ++x) {
        const std::int32_t beside =
            std::min(finished[x == 0 ? 0 : x - 1], finished[x == last ? last : x + 1]);
        row[x] = std::min({row[x], finished[x] + 1, beside + 1});
    }
    for (std::size_t x = 1; x <= last; ++x) {
        row[x] = std::min(row[x], row[x - 1] + 1);
    }
    for (std::size_t x = last; x-- > 0;) {
        row[x] = std::min(row[x], row[x + 1] + 1);
    }
}

/// The lowest of the parabolas (x - place)^2 + distance^2, one for each column with a transparent
/// pixel in reach above or below: squared straight distances (lower envelope of parabolas).
class TStraightDistances {
public:
    /// Squared distances of a row from the vertical ones.
    const std::vector<double>& Find(const TDistances& vertical, std::int32_t limit) {
        BuildEnvelope(vertical, limit);
        squares_.assign(vertical.size(), std::numeric_limits<double>::infinity());
        std::size_t piece = 0;
        for (std::size_t x = 0; x < squares_.size() && !pieces_.empty(); ++x) {
            const auto column = static_cast<double>(x);
            while (piece + 1 < pieces_.size() && pieces_[piece + 1].from <= column) {
                ++piece;
            }
            const double way = column - pieces_[piece].place;
            squares_[x] = way * way + pieces_[piece].height;
        }
        return squares_;
    }

private:
    /// A parabola and the place from which on it is the lowest.
    struct TPiece {
        double place;
        double height;
        double from;
    };

    static double Meeting(const TPiece& a, const TPiece& b) {
        const double rise = b.height + b.place * b.place - a.height - a.place * a.place;
        return rise / (2.0 * (b.place - a.place));
    }

    void BuildEnvelope(const TDistances& vertical, std::int32_t limit) {
        pieces_.clear();
        for (std::size_t x = 0; x < vertical.size(); ++x) {
            if (vertical[x] >= limit) {
                continue;
            }
            const auto height = static_cast<double>(vertical[x]);
            TPiece piece{static_cast<double>(x), height * height, 0.0};
            while (!pieces_.empty()) {
                piece.from = Meeting(pieces_.back(), piece);
                if (piece.from > pieces_.back().from || pieces_.size() == 1) {
                    break;
                }
                pieces_.pop_back();
            }
            pieces_.push_back(piece);
        }
    }

    std::vector<TPiece> pieces_;
    std::vector<double> squares_;
};

std::uint8_t Faded(std::uint8_t value, double distance, double limit) {
    return distance < limit ? static_cast<std::uint8_t>(RoundHalfEven(value * distance / limit))
                            : value;
}

class TFeather {
public:
    TFeather(TZmBitmap& plane, TZmBitmap& store, std::int32_t limit, bool quick)
        : plane_(plane), store_(store), limit_(limit), is_quick_(quick) {}

    void Run() {
        const std::int32_t height = plane_.GetHeight();
        const auto width = static_cast<std::size_t>(plane_.GetWidth());
        TDistances finished(width, limit_);
        TDistances row(width);
        for (std::int32_t y = 0; y < height; ++y) {
            const std::uint8_t* const alpha = plane_.GetScanLine(y);
            for (std::size_t x = 0; x < width; ++x) {
                row[x] = alpha[x] == 0 ? 0 : limit_;
            }
            Step(finished, row);
            StoreDistances(store_, y, row);
            finished.swap(row);
        }
        std::fill(finished.begin(), finished.end(), limit_);
        for (std::int32_t y = height - 1; y >= 0; --y) {
            LoadDistances(store_, y, row);
            Step(finished, row);
            FadeRow(plane_.GetScanLine(y), row);
            finished.swap(row);
        }
    }

private:
    void Step(const TDistances& finished, TDistances& row) const {
        if (is_quick_) {
            StepToNeighbours(finished, row);
        } else {
            StepFromRow(finished, row);
        }
    }

    void FadeRow(std::uint8_t* alpha, const TDistances& row) {
        if (is_quick_) {
            for (std::size_t x = 0; x < row.size(); ++x) {
                alpha[x] = Faded(alpha[x], row[x], limit_);
            }
            return;
        }
        const std::vector<double>& squares = straight_.Find(row, limit_);
        for (std::size_t x = 0; x < squares.size(); ++x) {
            alpha[x] = Faded(alpha[x], std::sqrt(squares[x]), limit_);
        }
    }

    TZmBitmap& plane_;
    TZmBitmap& store_;
    std::int32_t limit_;
    bool is_quick_;
    TStraightDistances straight_;
};

}  // namespace

void TZmBitmap::FeatherAlphaEdges(std::int32_t feather_depth, bool quick) {
    TZmBitmap* const plane = fIsAlpha ? this : fAlphaChannel.get();
    if (feather_depth < 1 || plane == nullptr || plane->IsEmpty() || plane->fIsVirtual ||
        plane->fPixelFormat != zm8g) {
        return;
    }
    TZmBitmap store;
    store.fMinFileSize = fMinFileSize;
    if (store.Allocate(plane->fWidth, plane->fHeight, zm16g)) {
        TFeather(*plane, store, std::min(feather_depth, kLargestDepth) + 1, quick).Run();
        plane->SyncFull();
        Changed();
    }
}

}  // namespace zm
