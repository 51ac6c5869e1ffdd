/// The outline of a mask, painted on a platform bitmap at a zoom.

#include <algorithm>
#include <cmath>
#include <vector>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"

namespace zm {
namespace {

constexpr std::int64_t kDashPixels = 4;
constexpr std::int32_t kOutside = -1;
constexpr TRGB kBlack{0, 0, 0};
constexpr TRGB kWhite{255, 255, 255};

enum class TSide { kInner, kOuter };
enum class TPaint { kDashes, kInversion };

/// Mask column (or row) that a canvas column shows.
std::int32_t MaskPlace(std::int64_t canvas, std::int32_t start, double zoom, std::int32_t size) {
    const double place = std::floor(static_cast<double>(canvas - start) / zoom);
    return place >= 0 && place < size ? static_cast<std::int32_t>(place) : kOutside;
}

/// Rows of the zoomed mask, with one column more on each side of the canvas.
class TZoomedRows {
public:
    TZoomedRows(TZmMask& mask, const TZmMaskView& view, std::int32_t width)
        : mask_(mask), view_(view), columns_(static_cast<std::size_t>(width) + 2) {
        for (std::size_t i = 0; i < columns_.size(); ++i) {
            columns_[i] =
                MaskPlace(static_cast<std::int64_t>(i) - 1, view.left, view.zoom, mask.GetWidth());
        }
    }

    /// Whether the pixels of canvas row `y` are set, from column -1 on.
    void Load(std::int64_t y, std::vector<char>& row) const {
        const std::int32_t line = MaskPlace(y, view_.top, view_.zoom, mask_.GetHeight());
        row.assign(columns_.size(), 0);
        for (std::size_t i = 0; line != kOutside && i < columns_.size(); ++i) {
            row[i] = columns_[i] != kOutside && mask_.GetPixel(columns_[i], line) != 0 ? 1 : 0;
        }
    }

private:
    TZmMask& mask_;
    const TZmMaskView& view_;
    std::vector<std::int32_t> columns_;
};

/// Calls `visit(x, y)` for the canvas pixels of one side of the outline, row by row. A pixel is
/// of the outline when one of its four neighbours is of the other kind.
template <typename Visit>
void VisitOutline(TZmMask& mask, const TZmMaskView& view, std::int32_t width, std::int32_t height,
                  TSide side, Visit&& visit) {
    const TZoomedRows rows(mask, view, width);
    std::vector<char> above;
    std::vector<char> row;
    std::vector<char> below;
    rows.Load(-1, row);
    rows.Load(0, below);
    const char kind = side == TSide::kInner ? 1 : 0;
    for (std::int32_t y = 0; y < height; ++y) {
        above.swap(row);
        row.swap(below);
        rows.Load(std::int64_t{y} + 1, below);
        for (std::size_t i = 1; i + 1 < row.size(); ++i) {
            if (row[i] == kind && (row[i - 1] != kind || row[i + 1] != kind || above[i] != kind ||
                                   below[i] != kind)) {
                visit(static_cast<std::int32_t>(i - 1), y);
            }
        }
    }
}

bool IsWhiteDash(std::int32_t x, std::int32_t y, std::int32_t phase) {
    const std::int64_t place = std::int64_t{x} + y + phase;
    return (place & (2 * kDashPixels - 1)) < kDashPixels;
}

TRGB Inverted(TRGB color) {
    return TRGB{static_cast<std::uint8_t>(255 - color.b), static_cast<std::uint8_t>(255 - color.g),
                static_cast<std::uint8_t>(255 - color.r)};
}

void PaintOutline(TZmMask& mask, TBitmap* canvas, const TZmMaskView& view, TSide side,
                  TPaint paint) {
    if (canvas == nullptr || mask.GetScanLine(0) == nullptr || !std::isfinite(view.zoom) ||
        view.zoom <= 0) {
        return;
    }
    TZmBitmap image;
    image.EncapsulateTBitmap(canvas, /*do_free_image=*/true);
    if (image.IsEmpty()) {
        return;
    }
    VisitOutline(mask, view, image.GetWidth(), image.GetHeight(), side,
                 [&](std::int32_t x, std::int32_t y) {
                     const bool is_white = IsWhiteDash(x, y, view.phase);
                     if (paint == TPaint::kDashes) {
                         image.SetPixels(x, y, is_white ? kWhite : kBlack);
                     } else if (is_white) {
                         image.SetPixels(x, y, Inverted(image.GetPixels(x, y)));
                     }
                 });
    canvas->SetModified(true);
}

}  // namespace

void TZmMask::DrawOutline(TBitmap* canvas, const TZmMaskView& view) {
    PaintOutline(*this, canvas, view, TSide::kInner, TPaint::kDashes);
}

void TZmMask::DrawOuter(TBitmap* canvas, const TZmMaskView& view) {
    PaintOutline(*this, canvas, view, TSide::kOuter, TPaint::kDashes);
}

void TZmMask::InvertCanvas(TBitmap* canvas, const TZmMaskView& view) {
    PaintOutline(*this, canvas, view, TSide::kInner, TPaint::kInversion);
}

}  // namespace zm
