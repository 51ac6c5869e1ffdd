/// Changes of the alpha plane by rectangles, colours and other planes.

#include <algorithm>
#include <array>
#include <cmath>
#include <vector>

#include "engine/bitmap/zmcopyspan_p.h"
#include "engine/bitmap/zmgradient_p.h"
#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// What one source value adds to the other side's.
std::array<double, 256> MakeMergeTable(TZmAlphaMergeMode mode, double rate) {
    std::array<double, 256> table{};
    for (std::size_t i = 0; i < table.size(); ++i) {
        table[i] = (mode == zmaSubtract ? -rate : rate) * static_cast<double>(i);
    }
    return table;
}

void MergeRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
              const std::array<double, 256>& table, bool keeps_dest) {
    for (std::int32_t x = 0; x < width; ++x) {
        const double before = keeps_dest ? dest[x] : 0;
        dest[x] = Clamp8(RoundHalfEven(before + table[source[x]]));
    }
}

bool IsBetween(TRGB color, TRGB low, TRGB high) {
    return color.r >= low.r && color.r <= high.r && color.g >= low.g && color.g <= high.g &&
           color.b >= low.b && color.b <= high.b;
}

TZmPixelBytes GrayPixel(std::int32_t value) {
    return TZmPixelBytes{Clamp8(value)};
}

/// Alpha of the pixels of row `y` from column x on; 255 where no plane is.
void LoadAlphaRow(TZmBitmap* plane, std::int32_t x, std::int32_t y,
                  std::vector<std::uint8_t>& values) {
    std::fill(values.begin(), values.end(), std::uint8_t{255});
    if (plane == nullptr || plane->GetPixelFormat() != zm8g || y >= plane->GetHeight() ||
        x >= plane->GetWidth()) {
        return;
    }
    if (const std::uint8_t* const row = plane->GetScanLine(y)) {
        const auto covered = static_cast<std::size_t>(plane->GetWidth() - x);
        std::copy_n(row + x, std::min(covered, values.size()), values.begin());
    }
}

}  // namespace

void TZmBitmap::AlphaFillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                              std::int32_t value) {
    TZmBitmap* const plane = GetAlphaChannel();
    if (plane == nullptr || plane->IsEmpty()) {
        return;
    }
    plane->FillRect(x1, y1, x2, y2, static_cast<double>(value));
    if (x1 <= 0 && y1 <= 0 && x2 >= plane->fWidth - 1 && y2 >= plane->fHeight - 1) {
        plane->fFull = (value & 255) == 255;
    }
}

void TZmBitmap::AlphaFillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                              std::int32_t start_value, std::int32_t end_value,
                              TZmGradientDirection direction) {
    TZmBitmap* const plane = GetAlphaChannel();
    if (plane != nullptr && plane->GetPixelFormat() == zm8g) {
        FillGradient(*plane, TRect{x1, y1, x2, y2}, direction, GrayPixel(start_value),
                     GrayPixel(end_value));
    }
}

void TZmBitmap::MergeAlphaRectTo(TZmBitmap* dest, std::int32_t src_x, std::int32_t src_y,
                                 std::int32_t dst_x, std::int32_t dst_y, std::int32_t rect_width,
                                 std::int32_t rect_height, TZmAlphaMergeMode mode, double rate) {
    if (dest == nullptr || IsEmpty() || dest->IsEmpty() || std::isnan(rate)) {
        return;
    }
    TZmBitmap* const source_plane = fIsAlpha ? this : fAlphaChannel.get();
    TZmBitmap* const dest_plane = dest->fIsAlpha ? dest : dest->GetAlphaChannel();
    const auto columns = ClipCopySpan({src_x, dst_x, rect_width}, fWidth, dest_plane->GetWidth());
    const auto lines = ClipCopySpan({src_y, dst_y, rect_height}, fHeight, dest_plane->fHeight);
    if (!columns || !lines || dest_plane->fPixelFormat != zm8g) {
        return;
    }
    const auto width = static_cast<std::int32_t>(columns->length);
    const std::array<double, 256> table = MakeMergeTable(mode, rate);
    std::vector<std::uint8_t> values(static_cast<std::size_t>(width));
    // Inside one plane, rows are taken before they are overwritten.
    const bool is_upward = source_plane == dest_plane && lines->dest > lines->source;
    for (std::int64_t i = 0; i < lines->length; ++i) {
        const std::int64_t line = is_upward ? lines->length - 1 - i : i;
        const auto from_y = static_cast<std::int32_t>(lines->source + line);
        const auto to_y = static_cast<std::int32_t>(lines->dest + line);
        LoadAlphaRow(source_plane, static_cast<std::int32_t>(columns->source), from_y, values);
        MergeRow(values.data(), dest_plane->GetScanLine(to_y) + columns->dest, width, table,
                 mode != zmaSet);
    }
    dest_plane->SyncFull();
    dest->Changed();
}

void TZmBitmap::SetTransparentColors(TRGB min_color, TRGB max_color, std::int32_t alpha) {
    TZmBitmap* const plane = IsEmpty() ? nullptr : GetAlphaChannel();
    if (plane == nullptr || plane->GetPixelFormat() != zm8g) {
        return;
    }
    const std::int32_t width = std::min(fWidth, plane->fWidth);
    const std::int32_t height = std::min(fHeight, plane->fHeight);
    TZmRgbRows rows(*this);
    bool is_any = false;
    for (std::int32_t y = 0; y < height; ++y) {
        const TRGB* const colors = rows.GetRow(y);
        std::uint8_t* const values = plane->GetScanLine(y);
        for (std::int32_t x = 0; colors != nullptr && x < width; ++x) {
            if (IsBetween(colors[x], min_color, max_color)) {
                values[x] = static_cast<std::uint8_t>(alpha);
                is_any = true;
            }
        }
    }
    plane->fFull = plane->fFull && (!is_any || (alpha & 255) == 255);
    Changed();
}

}  // namespace zm
