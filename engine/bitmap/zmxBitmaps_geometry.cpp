/// Copies and moves of rectangles.

#include <algorithm>
#include <vector>

#include "engine/bitmap/zmbitrow_p.h"
#include "engine/bitmap/zmcopyspan_p.h"
#include "engine/bitmap/zmellipse_p.h"
#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmrunmover_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// Pixels that go through RGB at a time, so that the buffer stays in the nearest cache.
constexpr std::int32_t kRunPixels = 4096;

/// Copies runs of pixels from rows of one bitmap to rows of another or of the same.
class TRunCopier {
public:
    TRunCopier(const TZmRowLayout& source, const TZmRowLayout& dest, bool is_same_bitmap,
               const TRunMover& mover)
        : source_(source),
          dest_(dest),
          is_same_format_(source.format == dest.format),
          is_same_bitmap_(is_same_bitmap),
          pixel_bytes_(PixelFormatInfo(source.format).bit_count / 8),
          mover_(mover) {}

    void Copy(const std::uint8_t* from, std::int32_t from_x, std::uint8_t* to, std::int32_t to_x,
              std::int32_t count) {
        if (!is_same_format_) {
            ConvertRun(from, from_x, to, to_x, count);
        } else if (source_.format == zm1g) {
            CopyBitRun(from, from_x, to, to_x, count);
        } else {
            const auto bytes =
                static_cast<std::size_t>(count) * static_cast<std::size_t>(pixel_bytes_);
            mover_.Move(to + std::int64_t{to_x} * pixel_bytes_,
                        from + std::int64_t{from_x} * pixel_bytes_, bytes);
        }
    }

private:
    void ConvertRun(const std::uint8_t* from, std::int32_t from_x, std::uint8_t* to,
                    std::int32_t to_x, std::int32_t count) {
        pixels_.resize(static_cast<std::size_t>(std::min(count, kRunPixels)));
        while (count > 0) {
            const std::int32_t length = std::min(count, kRunPixels);
            LoadRGBPixels(from, from_x, length, source_, pixels_.data());
            StoreRGBPixels(pixels_.data(), to, to_x, length, dest_);
            from_x += length;
            to_x += length;
            count -= length;
        }
    }
    void CopyBitRun(const std::uint8_t* from, std::int32_t from_x, std::uint8_t* to,
                    std::int32_t to_x, std::int32_t count) {
        if (!is_same_bitmap_) {
            CopyBits(from, from_x, to, to_x, count);
            return;
        }
        bits_.resize(static_cast<std::size_t>(count) / 8 + 1);
        CopyBits(from, from_x, bits_.data(), 0, count);
        CopyBits(bits_.data(), 0, to, to_x, count);
    }

    const TZmRowLayout& source_;
    const TZmRowLayout& dest_;
    bool is_same_format_;
    bool is_same_bitmap_;
    std::int32_t pixel_bytes_;
    const TRunMover& mover_;
    std::vector<TRGB> pixels_;
    std::vector<std::uint8_t> bits_;
};

/// Moves an inclusive rectangle that lies inside one plane of pixels.
void MovePixels(TZmBitmap& pixels, const TRect& region, std::int32_t dst_x, std::int32_t dst_y,
                double background_value, bool clear_region) {
    const std::int32_t width = region.right - region.left + 1;
    const std::int32_t height = region.bottom - region.top + 1;
    TZmBitmap moved;
    moved.SetMinFileSize(pixels.GetMinFileSize());
    if (!moved.Allocate(width, height, pixels.GetPixelFormat())) {
        return;
    }
    pixels.CopyPaletteTo(&moved);
    pixels.CopyRectTo(&moved, region.left, region.top, 0, 0, width, height,
                      /*copy_alpha=*/false);
    if (clear_region) {
        pixels.FillRect(region.left, region.top, region.right, region.bottom, background_value);
    }
    moved.CopyRectTo(&pixels, 0, 0, dst_x, dst_y, width, height, /*copy_alpha=*/false);
}

}  // namespace

void TZmBitmap::CopyRectTo(TZmBitmap* dest, std::int32_t src_x, std::int32_t src_y,
                           std::int32_t dst_x, std::int32_t dst_y, std::int32_t rect_width,
                           std::int32_t rect_height, bool copy_alpha) {
    CopyToEx(dest, src_x, src_y, dst_x, dst_y, rect_width, rect_height, copy_alpha,
             /*elliptical_copy=*/false);
}

void TZmBitmap::CopyToEx(TZmBitmap* dest, std::int32_t src_x, std::int32_t src_y,
                         std::int32_t dst_x, std::int32_t dst_y, std::int32_t rect_width,
                         std::int32_t rect_height, bool copy_alpha, bool elliptical_copy) {
    if (dest == nullptr || IsEmpty() || dest->IsEmpty() || dest->fIsVirtual) {
        return;
    }
    if (copy_alpha && fAlphaChannel != nullptr) {
        TZmBitmap* const plane = dest->GetAlphaChannel();
        if (plane != nullptr) {
            const bool is_full = plane->fFull && fAlphaChannel->fFull;
            fAlphaChannel->CopyToEx(plane, src_x, src_y, dst_x, dst_y, rect_width, rect_height,
                                    /*copy_alpha=*/false, elliptical_copy);
            plane->fFull = is_full;
        }
    }
    const auto columns = ClipCopySpan({src_x, dst_x, rect_width}, fWidth, dest->fWidth);
    const auto lines = ClipCopySpan({src_y, dst_y, rect_height}, fHeight, dest->fHeight);
    if (!columns || !lines) {
        return;
    }
    const TRect area{static_cast<std::int32_t>(columns->dest),
                     static_cast<std::int32_t>(lines->dest),
                     static_cast<std::int32_t>(columns->dest + columns->length),
                     static_cast<std::int32_t>(lines->dest + lines->length)};
    const auto shift_x = static_cast<std::int32_t>(columns->source - columns->dest);
    const auto shift_y = static_cast<std::int32_t>(lines->source - lines->dest);
    const TRect frame{dst_x, dst_y, rect_width, rect_height};
    CopyRowsTo(*dest, area, shift_x, shift_y, elliptical_copy ? &frame : nullptr);
    dest->Changed();
}

/// Copies the rows of `area` (in the destination, right and bottom exclusive) from the places
/// `shift_x`, `shift_y` further on in this image. `frame` (corner, width, height in the
/// destination), when given, is the rectangle around the ellipse to which the copy is limited.
void TZmBitmap::CopyRowsTo(TZmBitmap& dest, const TRect& area, std::int32_t shift_x,
                           std::int32_t shift_y, const TRect* frame) {
    const bool is_same_bitmap = &dest == this;
    const TZmRowLayout source_layout = GetRowLayout();
    const TZmRowLayout dest_layout = dest.GetRowLayout();
    const std::int64_t pixels = std::int64_t{area.right - area.left} * (area.bottom - area.top);
    const TRunMover mover(dest, pixels / 8 * fBitCount);
    TRunCopier copier(source_layout, dest_layout, is_same_bitmap, mover);
    // Inside one image, rows are taken before they are overwritten.
    const bool is_upward = is_same_bitmap ? shift_y < 0 : IsStoredBottomUp(dest);
    for (std::int32_t i = 0; i < area.bottom - area.top; ++i) {
        const std::int32_t y = is_upward ? area.bottom - 1 - i : area.top + i;
        std::int64_t left = area.left;
        std::int64_t right = area.right;
        if (frame != nullptr) {
            const TZmEllipse ellipse{static_cast<double>(frame->right),
                                     static_cast<double>(frame->bottom)};
            const auto [first, count] = ellipse.RowSpan(std::int64_t{y} - frame->top);
            left = std::max(left, frame->left + first);
            right = std::min(right, frame->left + first + count);
        }
        if (left >= right) {
            continue;
        }
        const auto x = static_cast<std::int32_t>(left);
        const std::uint8_t* const from = GetRow(y + shift_y);
        std::uint8_t* const to = dest.GetRow(y);
        if (from != nullptr && to != nullptr) {
            copier.Copy(from, x + shift_x, to, x, static_cast<std::int32_t>(right - left));
        }
        dest.FreeRow(y);
        FreeRow(y + shift_y);
    }
}

void TZmBitmap::MoveRegion(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                           std::int32_t dst_x, std::int32_t dst_y, double background_value,
                           std::int32_t fill_alpha, bool clear_region) {
    if (IsEmpty() || fIsVirtual) {
        return;
    }
    const TRect region{std::max(x1, 0), std::max(y1, 0), std::min(x2, fWidth - 1),
                       std::min(y2, fHeight - 1)};
    if (region.left > region.right || region.top > region.bottom) {
        return;
    }
    // What lies outside the image stays behind, and the rest keeps its place in the rectangle.
    const std::int32_t to_x = SaturateToInt32(std::int64_t{dst_x} + region.left - x1);
    const std::int32_t to_y = SaturateToInt32(std::int64_t{dst_y} + region.top - y1);
    MovePixels(*this, region, to_x, to_y, background_value, clear_region);
    TZmBitmap* const plane = fAlphaChannel.get();
    if (plane != nullptr && !plane->IsEmpty()) {
        const TRect part{region.left, region.top, std::min(region.right, plane->fWidth - 1),
                         std::min(region.bottom, plane->fHeight - 1)};
        const bool is_full = plane->fFull && (!clear_region || (fill_alpha & 255) == 255);
        if (part.left <= part.right && part.top <= part.bottom) {
            MovePixels(*plane, part, to_x, to_y, fill_alpha, clear_region);
        }
        plane->fFull = is_full;
    }
    Changed();
}

}  // namespace zm
