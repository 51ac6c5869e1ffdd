/// Views of bitmaps: clipped and turned by quarters.

#include "engine/bitmap/zmvirtualbitmaps.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <utility>

#include "engine/bitmap/zmbitrow_p.h"

namespace zm {
namespace {

/// An alpha plane as a view, with its rows beside it.
template <typename Rows>
class TPlaneView : public TZmBitmap {
public:
    template <typename... Arguments>
    explicit TPlaneView(Arguments&&... arguments) : rows_(std::forward<Arguments>(arguments)...) {
        SetVirtualProvider(&rows_);
    }

private:
    Rows rows_;
};

/// Whether a run of pixels that is asked for lies in a view whose format still is the source's.
bool IsRunOf(TZmBitmap& view, std::int32_t row, std::int32_t start, std::int32_t width,
             TZmPixelFormat format) {
    return view.GetPixelFormat() == format && row >= 0 && row < view.GetHeight() && start >= 0 &&
           width >= 0 && start <= view.GetWidth() - width;
}

/// Gives a view its size and what it shares with its source.
bool SetUpView(TZmBitmap& view, TZmBitmap& source, std::int32_t width, std::int32_t height) {
    if (!view.Allocate(width, height, source.GetPixelFormat())) {
        return false;
    }
    source.CopyPaletteTo(&view);
    view.CopyDisplaySettingsFrom(source);
    view.SetDefaultDitherMethod(source.GetDefaultDitherMethod());
    return true;
}

/// Gives a view the view of its source's plane, when there is one that can be read.
template <typename Rows, typename... Arguments>
void SetUpPlane(TZmBitmap& view, TZmBitmap& source, TZmViewAlpha alpha, Arguments... arguments) {
    TZmBitmap* const plane = source.GetAlphaChannelRaw();
    if (alpha == TZmViewAlpha::kWithoutPlane || plane == nullptr || plane->IsEmpty() ||
        plane->GetPixelFormat() != zm8g) {
        return;
    }
    auto plane_view = std::make_unique<TPlaneView<Rows>>(*plane, arguments...);
    if (SetUpView(*plane_view, *plane, view.GetWidth(), view.GetHeight())) {
        plane_view->SetFull(plane->GetFull());
        view.ReplaceAlphaChannel(std::move(plane_view));
    }
}

std::vector<std::uint8_t>& FitBuffer(std::vector<std::uint8_t>& buffer, TZmBitmap& view) {
    buffer.resize(static_cast<std::size_t>(view.GetRowLen()));
    return buffer;
}

TRect IntersectWithImage(const TRect& rect, TZmBitmap& source) {
    TRect limited{std::clamp(rect.left, 0, source.GetWidth()),
                  std::clamp(rect.top, 0, source.GetHeight()), 0, 0};
    limited.right = std::clamp(rect.right, limited.left, source.GetWidth());
    limited.bottom = std::clamp(rect.bottom, limited.top, source.GetHeight());
    return limited;
}

}  // namespace

// Clipped views.

TZmClippedRows::TZmClippedRows(TZmBitmap& source, std::int32_t left, std::int32_t top)
    : source_(source), left_(left), top_(top) {}

std::uint8_t* TZmClippedRows::GetRow(TZmBitmap* bitmap, std::int32_t row, std::int32_t start,
                                     std::int32_t width) {
    if (!IsRunOf(*bitmap, row, start, width, source_.GetPixelFormat())) {
        return nullptr;
    }
    const std::int32_t first = left_ + start;
    const std::int32_t source_row = top_ + row;
    const bool is_inside = source_row < source_.GetHeight() &&
                           first <= source_.GetWidth() - width && bitmap->GetPixelFormat() != zm1g;
    return is_inside ? source_.GetSegment(source_row, first, width)
                     : CopyRow(*bitmap, source_row, first, width);
}

/// Bits have to be shifted to the first byte, and missing pixels filled up.
std::uint8_t* TZmClippedRows::CopyRow(TZmBitmap& bitmap, std::int32_t source_row,
                                      std::int32_t first, std::int32_t width) {
    std::vector<std::uint8_t>& buffer = FitBuffer(buffer_, bitmap);
    std::fill(buffer.begin(), buffer.end(), std::uint8_t{255});
    const std::uint8_t* const row =
        source_row < source_.GetHeight() ? source_.GetScanLine(source_row) : nullptr;
    const std::int32_t covered = std::min(source_.GetWidth() - first, width);
    if (row != nullptr && covered > 0) {
        const std::int64_t bits = source_.GetBitCount();
        CopyBits(row, first * bits, buffer.data(), 0, covered * bits);
    }
    return buffer.data();
}

TZmVirtualClippedBitmap::TZmVirtualClippedBitmap(TZmBitmap& source, const TRect& rect,
                                                 TZmViewAlpha alpha)
    : rows_(source, IntersectWithImage(rect, source).left, IntersectWithImage(rect, source).top) {
    const TRect limited = IntersectWithImage(rect, source);
    SetVirtualProvider(&rows_);
    if (SetUpView(*this, source, limited.right - limited.left, limited.bottom - limited.top)) {
        SetUpPlane<TZmClippedRows>(*this, source, alpha, limited.left, limited.top);
    }
}

// Turned views.

TZmRotatedRows::TZmRotatedRows(TZmBitmap& source, std::int32_t quarter_turns, std::int32_t width,
                               std::int32_t height)
    : source_(source), quarter_turns_(quarter_turns), last_x_(width - 1), last_y_(height - 1) {}

std::uint8_t* TZmRotatedRows::GetRow(TZmBitmap* bitmap, std::int32_t row, std::int32_t start,
                                     std::int32_t width) {
    if (!IsRunOf(*bitmap, row, start, width, source_.GetPixelFormat())) {
        return nullptr;
    }
    std::vector<std::uint8_t>& buffer = FitBuffer(buffer_, *bitmap);
    std::fill(buffer.begin(), buffer.end(), std::uint8_t{255});
    const std::int64_t bits = source_.GetBitCount();
    for (std::int32_t i = 0; i < width; ++i) {
        const std::int32_t column = start + i;
        const std::int32_t positions[4][2] = {{column, row},
                                              {last_x_ - row, column},
                                              {last_x_ - column, last_y_ - row},
                                              {row, last_y_ - column}};
        const std::int32_t x = positions[quarter_turns_][0];
        const std::int32_t y = positions[quarter_turns_][1];
        const bool is_inside = x < source_.GetWidth() && y < source_.GetHeight();
        const std::uint8_t* const pixels = is_inside ? source_.GetScanLine(y) : nullptr;
        if (pixels != nullptr) {
            CopyBits(pixels, x * bits, buffer.data(), i * bits, bits);
        }
    }
    return buffer.data();
}

TZmVirtualRotatedBitmap::TZmVirtualRotatedBitmap(TZmBitmap& source, std::int32_t quarter_turns,
                                                 TZmViewAlpha alpha)
    : rows_(source, quarter_turns & 3, source.GetWidth(), source.GetHeight()) {
    const bool is_upright = (quarter_turns & 1) == 0;
    const std::int32_t width = is_upright ? source.GetWidth() : source.GetHeight();
    const std::int32_t height = is_upright ? source.GetHeight() : source.GetWidth();
    SetVirtualProvider(&rows_);
    if (SetUpView(*this, source, width, height)) {
        SetUpPlane<TZmRotatedRows>(*this, source, alpha, quarter_turns & 3, source.GetWidth(),
                                   source.GetHeight());
    }
}

}  // namespace zm
