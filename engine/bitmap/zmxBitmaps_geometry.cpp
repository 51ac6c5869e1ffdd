/// Crop, copies of rectangles and changes of the canvas size.

#include <algorithm>
#include <cmath>
#include <cstring>
#include <optional>
#include <utility>
#include <vector>

#include "engine/bitmap/zmbitrow_p.h"
#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// One axis of a copy, in 64 bits so that no sum of coordinates overflows.
struct TCopySpan {
    std::int64_t source = 0;
    std::int64_t dest = 0;
    std::int64_t length = 0;
};

/// Clips one axis: a negative destination shortens the run and advances the source, a negative
/// source starts at 0. Nothing when the run misses the source or the destination.
std::optional<TCopySpan> ClipSpan(TCopySpan span, std::int64_t source_size,
                                  std::int64_t dest_size) {
    if (span.dest < 0) {
        span.length += span.dest;
        span.source -= span.dest;
        span.dest = 0;
    }
    if (span.length <= 0 || span.dest >= dest_size || span.source >= source_size ||
        span.source + span.length <= 0) {
        return std::nullopt;
    }
    span.source = std::max<std::int64_t>(span.source, 0);
    span.length = std::min({span.length, source_size - span.source, dest_size - span.dest});
    return span;
}

/// What a picture of `source_size` pixels has of a new axis of `dest_size` pixels that starts at
/// coordinate `start` of it. A length of 0 when the two do not meet.
struct TOverlap {
    std::int32_t source = 0;
    std::int32_t dest = 0;
    std::int32_t length = 0;
};

TOverlap FindOverlap(std::int32_t start, std::int32_t dest_size, std::int32_t source_size) {
    const std::int64_t first = std::max(start, 0);
    const std::int64_t end = std::min<std::int64_t>(source_size, std::int64_t{start} + dest_size);
    if (first >= end) {
        return {};
    }
    return {static_cast<std::int32_t>(first), static_cast<std::int32_t>(first - start),
            static_cast<std::int32_t>(end - first)};
}

/// Columns of a row of an ellipse: those whose centres lie inside it.
struct TEllipse {
    double width = 0;
    double height = 0;

    /// First column and number of columns of row `y`, counted from the ellipse's own corner.
    std::pair<std::int64_t, std::int64_t> RowSpan(std::int64_t y) const {
        const double distance = (static_cast<double>(y) + 0.5) / height * 2.0 - 1.0;
        const double half = std::sqrt(std::max(0.0, 1.0 - distance * distance)) * width / 2.0;
        const auto first = static_cast<std::int64_t>(std::ceil(width / 2.0 - half - 0.5));
        const auto last = static_cast<std::int64_t>(std::floor(width / 2.0 + half - 0.5));
        return {first, last - first + 1};
    }
};

/// Copies runs of pixels from rows of one bitmap to rows of another or of the same.
class TRunCopier {
public:
    TRunCopier(const TZmRowLayout& source, const TZmRowLayout& dest, bool is_same_bitmap)
        : source_(source),
          dest_(dest),
          is_same_format_(source.format == dest.format),
          is_same_bitmap_(is_same_bitmap),
          pixel_bytes_(PixelFormatInfo(source.format).bit_count / 8) {}

    void Copy(const std::uint8_t* from, std::int32_t from_x, std::uint8_t* to, std::int32_t to_x,
              std::int32_t count) {
        if (!is_same_format_) {
            pixels_.resize(static_cast<std::size_t>(count));
            LoadRGBPixels(from, from_x, count, source_, pixels_.data());
            StoreRGBPixels(pixels_.data(), to, to_x, count, dest_);
        } else if (source_.format == zm1g) {
            CopyBitRun(from, from_x, to, to_x, count);
        } else {
            const auto bytes = static_cast<std::size_t>(count) *
                               static_cast<std::size_t>(pixel_bytes_);
            const std::uint8_t* const first = from + std::int64_t{from_x} * pixel_bytes_;
            std::uint8_t* const target = to + std::int64_t{to_x} * pixel_bytes_;
            if (is_same_bitmap_) {
                std::memmove(target, first, bytes);
            } else {
                std::memcpy(target, first, bytes);
            }
        }
    }

private:
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
    std::vector<TRGB> pixels_;
    std::vector<std::uint8_t> bits_;
};

/// Fills what a picture of `inner` (inclusive) leaves free in a bitmap.
void FillAround(TZmBitmap& bitmap, const TRect& inner, TColor color) {
    const std::int32_t right = bitmap.GetWidth() - 1;
    const std::int32_t bottom = bitmap.GetHeight() - 1;
    const auto value = static_cast<double>(color);
    bitmap.FillRect(0, 0, right, inner.top - 1, value);
    bitmap.FillRect(0, inner.top, inner.left - 1, inner.bottom, value);
    bitmap.FillRect(inner.right + 1, inner.top, right, inner.bottom, value);
    bitmap.FillRect(0, inner.bottom + 1, right, bottom, value);
}

}  // namespace

// Copies of rectangles.

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
    const auto columns = ClipSpan({src_x, dst_x, rect_width}, fWidth, dest->fWidth);
    const auto lines = ClipSpan({src_y, dst_y, rect_height}, fHeight, dest->fHeight);
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
    TRunCopier copier(source_layout, dest_layout, is_same_bitmap);
    // Inside one image, rows are taken before they are overwritten.
    const bool is_upward = is_same_bitmap && shift_y < 0;
    for (std::int32_t i = 0; i < area.bottom - area.top; ++i) {
        const std::int32_t y = is_upward ? area.bottom - 1 - i : area.top + i;
        std::int64_t left = area.left;
        std::int64_t right = area.right;
        if (frame != nullptr) {
            const TEllipse ellipse{static_cast<double>(frame->right),
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

// Crop.

bool TZmBitmap::Crop(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                     TColor fill_color) {
    if (IsEmpty() || fIsVirtual) {
        return false;
    }
    if (x1 > x2 || y1 > y2 || (x1 == 0 && y1 == 0 && x2 == fWidth - 1 && y2 == fHeight - 1)) {
        return true;
    }
    const std::int64_t width = std::int64_t{x2} - x1 + 1;
    const std::int64_t height = std::int64_t{y2} - y1 + 1;
    TZmBitmap cropped;
    cropped.CopySettingsFrom(*this);
    cropped.fMinFileSize = fMinFileSize;
    cropped.fMemoryAllocator = fMemoryAllocator;
    cropped.fPaletteUsed = fPaletteUsed;
    if (width > kMaxInt32 || height > kMaxInt32 ||
        !cropped.Allocate(static_cast<std::int32_t>(width), static_cast<std::int32_t>(height),
                          fPixelFormat) ||
        !cropped.CropAlphaFrom(*this, x1, y1)) {
        return false;
    }
    cropped.fRGBPalette = fRGBPalette;
    cropped.CropPixelsFrom(*this, x1, y1, fill_color);
    return TakeCropped(cropped);
}

/// Takes over what `source` has of this new image, whose corner lies at x1, y1 there, and fills
/// the rest.
void TZmBitmap::CropPixelsFrom(TZmBitmap& source, std::int32_t x1, std::int32_t y1,
                               TColor fill_color) {
    const bool is_filled = fill_color != kCropNoFill;
    const TOverlap columns = FindOverlap(x1, fWidth, source.fWidth);
    const TOverlap lines = FindOverlap(y1, fHeight, source.fHeight);
    const bool is_overlapping = columns.length > 0 && lines.length > 0;
    if (is_filled && (!is_overlapping || fPixelFormat == zm1g)) {
        // One bit a pixel is filled whole, which gives the unused bits of the rows a value too.
        Fill(static_cast<double>(fill_color));
    } else if (is_filled) {
        FillAround(*this,
                   TRect{columns.dest, lines.dest, columns.dest + columns.length - 1,
                         lines.dest + lines.length - 1},
                   fill_color);
    }
    source.CopyRectTo(this, columns.source, lines.source, columns.dest, lines.dest,
                      columns.length, lines.length, /*copy_alpha=*/false);
}

/// Gives this new image the plane of `source`, cropped at the same corner; grown parts are
/// opaque. False without room.
bool TZmBitmap::CropAlphaFrom(TZmBitmap& source, std::int32_t x1, std::int32_t y1) {
    TZmBitmap* const plane = source.fAlphaChannel.get();
    if (plane == nullptr) {
        return true;
    }
    TZmBitmap* const cropped = GetAlphaChannel();
    if (cropped == nullptr || cropped->IsEmpty()) {
        return false;
    }
    const TOverlap columns = FindOverlap(x1, fWidth, plane->fWidth);
    const TOverlap lines = FindOverlap(y1, fHeight, plane->fHeight);
    plane->CopyRectTo(cropped, columns.source, lines.source, columns.dest, lines.dest,
                      columns.length, lines.length, /*copy_alpha=*/false);
    cropped->fFull = plane->fFull;
    return true;
}

bool TZmBitmap::Crop(const TRect& inclusive_rect, TColor fill_color) {
    return Crop(inclusive_rect.left, inclusive_rect.top, inclusive_rect.right,
                inclusive_rect.bottom, fill_color);
}

/// Makes a cropped picture this object's own; events and file parameters stay.
bool TZmBitmap::TakeCropped(TZmBitmap& cropped) {
    if (fLocation == zmTBitmap) {
        if (!ReplaceTBitmapPixels(cropped)) {
            return false;
        }
    } else {
        FreePixels();
        MovePixelsFrom(cropped);
    }
    fAlphaChannel = std::move(cropped.fAlphaChannel);
    Changed();
    return true;
}

// Canvas size.

void TZmBitmap::SetWidth(std::int32_t width) {
    if (width >= 0 && width != GetWidth()) {
        ResizeSide(width, fHeight);
    }
}

void TZmBitmap::SetHeight(std::int32_t height) {
    if (height >= 0 && height != GetHeight()) {
        ResizeSide(fWidth, height);
    }
}

/// Changes one side. Rows and columns that both sizes have keep their pixels. A side of 0 lets
/// the pixels go, and without room the image stays as it was.
void TZmBitmap::ResizeSide(std::int32_t new_width, std::int32_t new_height) {
    const bool has_room = fIsVirtual || ResizePixels(new_width, new_height);
    if (!has_room) {
        return;
    }
    fWidth = new_width;
    fHeight = new_height;
    DeriveFields();
    if (fAlphaChannel != nullptr) {
        fAlphaChannel->ResizeSide(new_width, new_height);
    }
    Changed();
}

bool TZmBitmap::ResizePixels(std::int32_t new_width, std::int32_t new_height) {
    if (new_width == 0 || new_height == 0 || fPixelFormat == zmnull) {
        FreePixels();
        return true;
    }
    TZmBitmap resized;
    resized.CopySettingsFrom(*this);
    resized.fMinFileSize = fMinFileSize;
    resized.fMemoryAllocator = fMemoryAllocator;
    if (!resized.Allocate(new_width, new_height, fPixelFormat)) {
        return false;
    }
    resized.fRGBPalette = fRGBPalette;
    resized.fPaletteUsed = fPaletteUsed;
    if (!IsEmpty()) {
        const auto row_bytes = static_cast<std::size_t>(std::min(fRowLen, resized.fRowLen));
        for (std::int32_t y = 0; y < std::min(fHeight, new_height); ++y) {
            std::memcpy(resized.GetScanLine(y), GetScanLine(y), row_bytes);
        }
    }
    if (fLocation == zmTBitmap) {
        return ReplaceTBitmapPixels(resized);
    }
    FreePixels();
    MovePixelsFrom(resized);
    return true;
}

}  // namespace zm
