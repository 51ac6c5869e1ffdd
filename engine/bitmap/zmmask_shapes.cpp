/// Shapes in masks, and the changes that touch all of a mask.

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <utility>
#include <vector>

#include "engine/bitmap/zmbitrow_p.h"
#include "engine/bitmap/zmellipse_p.h"
#include "engine/bitmap/zmmask.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

// Polygons.

/// An edge that is not horizontal, from its upper end on. It meets the rows from `top` to
/// `bottom` - 1.
struct TEdge {
    std::int32_t top;
    std::int32_t bottom;
    std::int64_t x;
    std::int64_t dx;
};

/// Where an edge meets a row: the pixels left and right of the point, equal when it falls on one.
struct TCrossing {
    std::int64_t floor;
    std::int64_t ceil;
    bool operator<(const TCrossing& other) const {
        return std::pair(floor, ceil) < std::pair(other.floor, other.ceil);
    }
};

/// Exact for all coordinates: both factors have 32 bits.
TCrossing FindCrossing(const TEdge& edge, std::int32_t y) {
    const auto rows = static_cast<std::uint64_t>(std::int64_t{y} - edge.top);
    const auto height = static_cast<std::uint64_t>(std::int64_t{edge.bottom} - edge.top);
    const std::uint64_t product = rows * static_cast<std::uint64_t>(std::llabs(edge.dx));
    const auto whole = static_cast<std::int64_t>(product / height);
    const std::int64_t rest = product % height != 0 ? 1 : 0;
    return edge.dx >= 0 ? TCrossing{edge.x + whole, edge.x + whole + rest}
                        : TCrossing{edge.x - whole - rest, edge.x - whole};
}

std::vector<TEdge> CollectEdges(std::span<const TPoint> points) {
    std::vector<TEdge> edges;
    for (std::size_t i = 0; i < points.size(); ++i) {
        TPoint upper = points[i];
        TPoint lower = points[i + 1 < points.size() ? i + 1 : 0];
        if (upper.y > lower.y) {
            std::swap(upper, lower);
        }
        if (upper.y != lower.y) {
            edges.push_back({upper.y, lower.y, upper.x, std::int64_t{lower.x} - upper.x});
        }
    }
    std::sort(edges.begin(), edges.end(),
              [](const TEdge& a, const TEdge& b) { return a.top < b.top; });
    return edges;
}

/// Goes down the rows of a polygon with the edges that meet the present one.
class TPolygonRows {
public:
    explicit TPolygonRows(std::span<const TPoint> points) : edges_(CollectEdges(points)) {}

    std::int32_t Top() const { return edges_.empty() ? kMaxInt32 : edges_.front().top; }
    /// Crossings of row `y`, in order; an even number. Rows have to be asked for downward.
    const std::vector<TCrossing>& Crossings(std::int32_t y) {
        while (next_ < edges_.size() && edges_[next_].top <= y) {
            active_.push_back(edges_[next_++]);
        }
        std::erase_if(active_, [y](const TEdge& edge) { return edge.bottom <= y; });
        crossings_.clear();
        for (const TEdge& edge : active_) {
            crossings_.push_back(FindCrossing(edge, y));
        }
        std::sort(crossings_.begin(), crossings_.end());
        return crossings_;
    }
    bool IsDone() const { return active_.empty() && next_ == edges_.size(); }

private:
    std::vector<TEdge> edges_;
    std::vector<TEdge> active_;
    std::size_t next_ = 0;
    std::vector<TCrossing> crossings_;
};

/// An offset that keeps first to last inside 0 to size - 1.
std::int32_t LimitMove(std::int32_t offset, std::int32_t first, std::int32_t last,
                       std::int32_t size) {
    return std::clamp(offset, -first, size - 1 - last);
}

std::vector<std::int32_t> MakeNearestTable(std::int32_t new_size, std::int32_t size) {
    std::vector<std::int32_t> table(static_cast<std::size_t>(new_size));
    for (std::int32_t i = 0; i < new_size; ++i) {
        table[static_cast<std::size_t>(i)] =
            static_cast<std::int32_t>(std::int64_t{i} * size / new_size);
    }
    return table;
}

void ResampleBits(const std::uint8_t* from, std::uint8_t* to,
                  const std::vector<std::int32_t>& columns) {
    for (std::size_t x = 0; x < columns.size(); ++x) {
        const std::int32_t column = columns[x];
        if ((from[column >> 3] >> (7 - (column & 7)) & 1) != 0) {
            to[x >> 3] = static_cast<std::uint8_t>(to[x >> 3] | 0x80 >> (x & 7));
        }
    }
}

}  // namespace

// Shapes.

/// Sets a run of pixels of one row, clipped to the mask.
void TZmMask::WriteRun(std::int32_t y, std::int64_t x1, std::int64_t x2, std::int32_t alpha) {
    const auto first = static_cast<std::int32_t>(std::clamp<std::int64_t>(x1, 0, fWidth));
    const auto last = static_cast<std::int32_t>(std::clamp<std::int64_t>(x2, -1, fWidth - 1));
    std::uint8_t* const row = first <= last ? GetScanLine(y) : nullptr;
    if (row == nullptr) {
        return;
    }
    const std::int32_t value = fBitsperpixel == 8 ? alpha & 255 : alpha != 0 ? 255 : 0;
    if (fBitsperpixel == 8) {
        std::memset(row + first, value, static_cast<std::size_t>(last - first + 1));
    } else {
        FillBits(row, first, std::int64_t{last} - first + 1, value != 0);
    }
    fFull = fFull && value == 255;
    if (value != 0) {
        fX1 = std::min(fX1, first);
        fY1 = std::min(fY1, y);
        fX2 = std::max(fX2, last);
        fY2 = std::max(fY2, y);
    }
}

void TZmMask::SetRectangle(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                           std::int32_t alpha) {
    if (x1 <= 0 && y1 <= 0 && x2 >= fWidth - 1 && y2 >= fHeight - 1) {
        Fill(alpha);
        return;
    }
    const std::int32_t bottom = std::min(y2, fHeight - 1);
    for (std::int32_t y = std::max(y1, 0); y <= bottom; ++y) {
        WriteRun(y, x1, x2, alpha);
    }
}

void TZmMask::SetEllipse(std::int32_t CenterX, std::int32_t CenterY, std::int32_t Width,
                         std::int32_t Height, std::int32_t Alpha) {
    if (Width < 1 || Height < 1) {
        return;
    }
    const TZmEllipse ellipse{static_cast<double>(Width), static_cast<double>(Height)};
    const std::int64_t left = std::int64_t{CenterX} - Width / 2;
    const std::int64_t top = std::int64_t{CenterY} - Height / 2;
    const std::int64_t bottom = std::min<std::int64_t>(top + Height, fHeight);
    for (std::int64_t y = std::max<std::int64_t>(top, 0); y < bottom; ++y) {
        const auto [first, count] = ellipse.RowSpan(y - top);
        WriteRun(static_cast<std::int32_t>(y), left + first, left + first + count - 1, Alpha);
    }
}

void TZmMask::DrawPolygon(std::span<const TPoint> points, std::int32_t alpha) {
    TPolygonRows rows(points);
    for (std::int32_t y = std::max(rows.Top(), 0); y < fHeight && !rows.IsDone(); ++y) {
        const std::vector<TCrossing>& crossings = rows.Crossings(y);
        for (std::size_t i = 0; i + 1 < crossings.size(); i += 2) {
            WriteRun(y, crossings[i].ceil, crossings[i + 1].floor, alpha);
        }
    }
    // Lower ends and horizontal edges, which the rows above do not reach.
    for (std::size_t i = 0; i < points.size(); ++i) {
        const TPoint point = points[i];
        const TPoint next = points[i + 1 < points.size() ? i + 1 : 0];
        const std::int32_t end = next.y == point.y ? next.x : point.x;
        WriteRun(point.y, std::min(point.x, end), std::max(point.x, end), alpha);
    }
}

// Changes of the whole.

void TZmMask::Negative(std::int32_t MaxVal) {
    for (std::int32_t y = 0; y < fHeight; ++y) {
        std::uint8_t* const row = GetScanLine(y);
        if (row == nullptr) {
            return;
        }
        for (std::int64_t i = 0; i < fRowlen; ++i) {
            row[i] = fBitsperpixel == 1 ? static_cast<std::uint8_t>(~row[i])
                                        : Clamp8(SaturateToInt32(std::int64_t{MaxVal} - row[i]));
        }
    }
    SyncRect();
    SyncFull();
}

void TZmMask::Intersect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2) {
    const std::int32_t bottom = std::min(fY2, fHeight - 1);
    for (std::int32_t y = fY1; !IsEmpty() && y <= bottom; ++y) {
        if (y < y1 || y > y2 || x1 > x2) {
            WriteRun(y, fX1, fX2, 0);
        } else {
            WriteRun(y, fX1, std::int64_t{x1} - 1, 0);
            WriteRun(y, std::int64_t{x2} + 1, fX2, 0);
        }
    }
    SyncRect();
    SyncFull();
}

/// Copies all pixels to a mask of the same depth, moved by an offset and clipped to it. False
/// without room.
bool TZmMask::MoveTo(TZmMask& dest, std::int32_t ox, std::int32_t oy) {
    const std::int64_t first = std::max<std::int64_t>(0, -std::int64_t{ox});
    const std::int64_t count =
        std::min<std::int64_t>(fWidth, std::int64_t{dest.fWidth} - ox) - first;
    for (std::int32_t y = 0; y < fHeight; ++y) {
        const std::int64_t to_y = std::int64_t{y} + oy;
        if (to_y < 0 || to_y >= dest.fHeight || count <= 0) {
            continue;
        }
        const std::uint8_t* const from = GetScanLine(y);
        std::uint8_t* const to = dest.GetScanLine(static_cast<std::int32_t>(to_y));
        if (from == nullptr || to == nullptr) {
            return false;
        }
        if (fBitsperpixel == 1) {
            CopyBits(from, first, to, first + ox, count);
        } else {
            std::memcpy(to + first + ox, from + first, static_cast<std::size_t>(count));
        }
    }
    dest.SyncRect();
    dest.SyncFull();
    return true;
}

void TZmMask::TakeOver(TZmMask& source) {
    fBits = std::move(source.fBits);
    fWidth = source.fWidth;
    fHeight = source.fHeight;
    fRowlen = source.fRowlen;
    fX1 = source.fX1;
    fY1 = source.fY1;
    fX2 = source.fX2;
    fY2 = source.fY2;
    fFull = source.fFull;
}

void TZmMask::TranslateBitmap(std::int32_t ox, std::int32_t oy, bool CutSel) {
    SyncRect();
    if (IsEmpty()) {
        return;
    }
    if (!CutSel) {
        ox = LimitMove(ox, fX1, fX2, fWidth);
        oy = LimitMove(oy, fY1, fY2, fHeight);
    }
    TZmMask moved;
    if (moved.AllocateBits(fWidth, fHeight, fBitsperpixel) && MoveTo(moved, ox, oy)) {
        TakeOver(moved);
    }
}

bool TZmMask::Resize(std::int32_t NewWidth, std::int32_t NewHeight) {
    if (NewWidth == fWidth && NewHeight == fHeight) {
        return fHeight > 0;
    }
    TZmMask resized;
    if (!resized.AllocateBits(NewWidth, NewHeight, fBitsperpixel) || !MoveTo(resized, 0, 0)) {
        return false;
    }
    TakeOver(resized);
    return true;
}

std::unique_ptr<TZmMask> TZmMask::CreateResampledMask(std::int32_t NewWidth,
                                                      std::int32_t NewHeight) {
    auto mask = std::make_unique<TZmMask>();
    if (!mask->AllocateBits(NewWidth, NewHeight, fBitsperpixel) ||
        mask->GetScanLine(0) == nullptr) {
        return nullptr;
    }
    const std::vector<std::int32_t> columns = MakeNearestTable(NewWidth, fWidth);
    for (std::int32_t y = 0; y < NewHeight; ++y) {
        const auto source_row = static_cast<std::int32_t>(std::int64_t{y} * fHeight / NewHeight);
        const std::uint8_t* const from = GetScanLine(source_row);
        std::uint8_t* const to = mask->GetScanLine(y);
        if (from == nullptr) {
            return nullptr;
        }
        if (fBitsperpixel == 1) {
            ResampleBits(from, to, columns);
        } else {
            std::transform(columns.begin(), columns.end(), to,
                           [from](std::int32_t column) { return from[column]; });
        }
    }
    mask->SyncRect();
    mask->SyncFull();
    return mask;
}

}  // namespace zm
