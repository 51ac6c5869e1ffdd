/// Crop and the other changes of the canvas size.

#include <algorithm>
#include <cstring>
#include <utility>

#include "engine/bitmap/zmrowfiller_p.h"
#include "engine/bitmap/zmrunmover_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

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

/// The place of a picture on a new axis, inclusive; past the axis when the two do not meet.
TRect PictureIn(const TOverlap& columns, const TOverlap& lines) {
    return TRect{columns.dest, lines.dest, columns.dest + columns.length - 1,
                 lines.dest + lines.length - 1};
}

/// Fills what a picture of `inner` (inclusive) leaves free in a bitmap.
void FillAround(TZmBitmap& bitmap, const TRect& inner, double value) {
    const std::int32_t right = bitmap.GetWidth() - 1;
    const std::int32_t bottom = bitmap.GetHeight() - 1;
    bitmap.FillRect(0, 0, right, inner.top - 1, value);
    bitmap.FillRect(0, inner.top, inner.left - 1, inner.bottom, value);
    bitmap.FillRect(inner.right + 1, inner.top, right, inner.bottom, value);
    bitmap.FillRect(0, inner.bottom + 1, right, bottom, value);
}

/// Where the columns and rows of a new picture come from, and what lies around them.
struct TCropPlan {
    TOverlap columns;
    TOverlap lines;
    const TRowFiller* filler = nullptr;  ///< nil: the rest stays as allocated
};

/// Makes a new picture of whole bytes row by row, each row whole, so that memory that the system
/// clears on its first use is written while it still lies in the caches.
void CropRows(TZmBitmap& source, TZmBitmap& dest, const TCropPlan& plan) {
    const std::int32_t width = dest.GetWidth();
    const std::int32_t right = plan.columns.dest + plan.columns.length;
    const auto pixel_bytes = static_cast<std::size_t>(dest.GetBitCount()) / 8;
    const auto count = static_cast<std::size_t>(plan.columns.length) * pixel_bytes;
    const std::size_t from = static_cast<std::size_t>(plan.columns.source) * pixel_bytes;
    const std::size_t to = static_cast<std::size_t>(plan.columns.dest) * pixel_bytes;
    const std::int32_t height = dest.GetHeight();
    const bool is_upward = IsStoredBottomUp(dest);
    for (std::int32_t i = 0; i < height; ++i) {
        const std::int32_t y = is_upward ? height - 1 - i : i;
        const std::int32_t line = y - plan.lines.dest;
        const bool is_inside = line >= 0 && line < plan.lines.length;
        std::uint8_t* const row = dest.GetScanLine(y);
        if (is_inside) {
            const std::uint8_t* const pixels = source.GetScanLine(plan.lines.source + line);
            std::memcpy(row + to, pixels + from, count);
        }
        if (plan.filler != nullptr) {
            plan.filler->Fill(row, 0, is_inside ? plan.columns.dest : width);
            plan.filler->Fill(row, right, is_inside ? width - right : 0);
        }
    }
}

/// First and last coordinate of a new canvas, counted in the old one. Both centre offsets, of a
/// canvas that shrinks and of one that grows, are truncated toward zero, as the division does.
std::pair<std::int32_t, std::int32_t> AlignAxis(std::int32_t old_size, std::int32_t new_size,
                                                bool is_centred, bool is_at_end) {
    const std::int32_t difference = old_size - new_size;
    const std::int32_t first = is_centred ? difference / 2 : is_at_end ? difference : 0;
    return {first, first + new_size - 1};
}

bool FindOpaqueSpan(const std::uint8_t* alpha, std::int32_t width, std::int32_t& first,
                    std::int32_t& last) {
    const auto is_visible = [](std::uint8_t value) { return value != 0; };
    const std::uint8_t* const end = alpha + width;
    const std::uint8_t* const begin = std::find_if(alpha, end, is_visible);
    if (begin == end) {
        return false;
    }
    first = static_cast<std::int32_t>(begin - alpha);
    last = width - 1;
    while (alpha[last] == 0) {
        --last;
    }
    return true;
}

void ExtendRect(TRect& rect, const TRect& part) {
    rect = TRect{std::min(rect.left, part.left), std::min(rect.top, part.top),
                 std::max(rect.right, part.right), std::max(rect.bottom, part.bottom)};
}

/// Bounding rectangle, inclusive, of what a plane does not make transparent in an image of a
/// size; empty when it makes all. Pixels that no plane covers are opaque.
TRect FindOpaqueRect(TZmBitmap& plane, std::int32_t width, std::int32_t height) {
    const std::int32_t covered_width = std::min(width, plane.GetWidth());
    const std::int32_t covered_height = std::min(height, plane.GetHeight());
    TRect rect{kMaxInt32, kMaxInt32, -1, -1};
    for (std::int32_t y = 0; y < covered_height; ++y) {
        const std::uint8_t* const alpha = plane.GetScanLine(y);
        std::int32_t first = 0;
        std::int32_t last = 0;
        if (alpha != nullptr && FindOpaqueSpan(alpha, covered_width, first, last)) {
            ExtendRect(rect, TRect{first, y, last, y});
        }
    }
    if (covered_width < width) {
        ExtendRect(rect, TRect{covered_width, 0, width - 1, height - 1});
    }
    if (covered_height < height) {
        ExtendRect(rect, TRect{0, covered_height, width - 1, height - 1});
    }
    return rect;
}

}  // namespace

// Crop.

bool TZmBitmap::Crop(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                     TColor fill_color) {
    const auto value = static_cast<double>(fill_color);
    return CropTo(TRect{x1, y1, x2, y2}, fill_color == kCropNoFill ? nullptr : &value, 255);
}

/// Makes an inclusive rectangle the new image. Grown parts take the value, unless it is nil, and
/// the alpha.
bool TZmBitmap::CropTo(const TRect& inclusive_rect, const double* fill_value,
                       std::int32_t fill_alpha) {
    if (IsEmpty() || fIsVirtual) {
        return false;
    }
    const auto [x1, y1, x2, y2] = inclusive_rect;
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
        !cropped.CropAlphaFrom(*this, x1, y1, fill_alpha)) {
        return false;
    }
    cropped.fRGBPalette = fRGBPalette;
    cropped.CropPixelsFrom(*this, x1, y1, fill_value);
    return TakeCropped(cropped);
}

/// Takes over what `source` has of this new image, whose corner lies at x1, y1 there, and fills
/// the rest.
void TZmBitmap::CropPixelsFrom(TZmBitmap& source, std::int32_t x1, std::int32_t y1,
                               const double* fill_value) {
    const TOverlap columns = FindOverlap(x1, fWidth, source.fWidth);
    const TOverlap lines = FindOverlap(y1, fHeight, source.fHeight);
    const bool is_overlapping = columns.length > 0 && lines.length > 0;
    const bool is_one_bit = fPixelFormat == zm1g;
    if (fill_value != nullptr && (!is_overlapping || is_one_bit)) {
        // One bit a pixel is filled whole, which gives the unused bits of the rows a value too.
        Fill(*fill_value);
    }
    if (is_overlapping && is_one_bit) {
        source.CopyRectTo(this, columns.source, lines.source, columns.dest, lines.dest,
                          columns.length, lines.length, /*copy_alpha=*/false);
    } else if (is_overlapping) {
        const TRowFiller filler(fPixelFormat,
                                MakePattern(fPixelFormat, fill_value ? *fill_value : 0), fWidth);
        CropRows(source, *this,
                 TCropPlan{columns, lines, fill_value != nullptr ? &filler : nullptr});
    }
}

/// Gives this new image the plane of `source`, cropped at the same corner; grown parts take
/// `alpha`, those that the plane did not cover are opaque. False without room.
bool TZmBitmap::CropAlphaFrom(TZmBitmap& source, std::int32_t x1, std::int32_t y1,
                              std::int32_t alpha) {
    TZmBitmap* const plane = source.fAlphaChannel.get();
    if (plane == nullptr) {
        return true;
    }
    TZmBitmap* const cropped = GetAlphaChannel();
    if (cropped == nullptr || cropped->IsEmpty()) {
        return false;
    }
    const bool is_opaque = (alpha & 255) == 255;
    const TOverlap picture_columns = FindOverlap(x1, fWidth, source.fWidth);
    const TOverlap picture_lines = FindOverlap(y1, fHeight, source.fHeight);
    const bool is_grown = picture_columns.length < fWidth || picture_lines.length < fHeight;
    if (picture_columns.length <= 0 || picture_lines.length <= 0) {
        cropped->Fill(static_cast<double>(alpha));
    } else if (!is_opaque) {
        FillAround(*cropped, PictureIn(picture_columns, picture_lines), alpha);
    }
    const TOverlap columns = FindOverlap(x1, fWidth, plane->fWidth);
    const TOverlap lines = FindOverlap(y1, fHeight, plane->fHeight);
    plane->CopyRectTo(cropped, columns.source, lines.source, columns.dest, lines.dest,
                      columns.length, lines.length, /*copy_alpha=*/false);
    cropped->fFull = plane->fFull && (is_opaque || !is_grown);
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

bool TZmBitmap::CropAlpha() {
    TZmBitmap* const plane = fAlphaChannel.get();
    if (plane == nullptr || plane->IsEmpty() || plane->fPixelFormat != zm8g || IsEmpty() ||
        fIsVirtual) {
        return false;
    }
    const TRect rect = FindOpaqueRect(*plane, fWidth, fHeight);
    const bool is_whole =
        rect.left == 0 && rect.top == 0 && rect.right == fWidth - 1 && rect.bottom == fHeight - 1;
    return rect.left <= rect.right && !is_whole && Crop(rect, kCropNoFill);
}

// Canvas size.

bool TZmBitmap::Resize(std::int32_t new_width, std::int32_t new_height, double background_value,
                       std::int32_t fill_alpha, TZmHorizAlign horiz_align,
                       TZmVertAlign vert_align) {
    if (new_width < 1 || new_height < 1) {
        return false;
    }
    if (fIsVirtual) {
        SetWidth(new_width);
        SetHeight(new_height);
        return true;
    }
    if (IsEmpty()) {
        return false;
    }
    const auto [x1, x2] =
        AlignAxis(fWidth, new_width, horiz_align == zmhCenter, horiz_align == zmhRight);
    const auto [y1, y2] =
        AlignAxis(fHeight, new_height, vert_align == zmvCenter, vert_align == zmvBottom);
    return CropTo(TRect{x1, y1, x2, y2}, &background_value, fill_alpha);
}

bool TZmBitmap::Resize(std::int32_t add_left, std::int32_t add_top, std::int32_t add_right,
                       std::int32_t add_bottom, double background_value, std::int32_t fill_alpha) {
    if (IsEmpty()) {
        return false;
    }
    const std::int64_t new_width = std::int64_t{fWidth} + add_left + add_right;
    const std::int64_t new_height = std::int64_t{fHeight} + add_top + add_bottom;
    if (new_width < 1 || new_height < 1 || new_width > kMaxInt32 || new_height > kMaxInt32) {
        return false;
    }
    if (fIsVirtual) {
        SetWidth(static_cast<std::int32_t>(new_width));
        SetHeight(static_cast<std::int32_t>(new_height));
        return true;
    }
    const std::int64_t x1 = -std::int64_t{add_left};
    const std::int64_t y1 = -std::int64_t{add_top};
    const std::int64_t x2 = x1 + new_width - 1;
    const std::int64_t y2 = y1 + new_height - 1;
    if (x1 > kMaxInt32 || y1 > kMaxInt32 || x2 > kMaxInt32 || y2 > kMaxInt32) {
        return false;
    }
    return CropTo(TRect{static_cast<std::int32_t>(x1), static_cast<std::int32_t>(y1),
                        static_cast<std::int32_t>(x2), static_cast<std::int32_t>(y2)},
                  &background_value, fill_alpha);
}

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
