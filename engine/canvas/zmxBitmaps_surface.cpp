/// The canvases of a bitmap, and regions of it that are drawn on apart.

#include <algorithm>
#include <array>
#include <utility>

#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/canvas/zmgdiplus.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kNoTransparency = 255;
constexpr double kFullOpacity = 1.0;
/// Pixels that are compared at a time, in buffers on the stack: a region comes back in a
/// destructor, where nothing may be allocated.
constexpr std::int32_t kRunPixels = 256;

/// The format of a copy to draw on. Deep formats have no platform bitmap; their copy is in RGB.
TZmPixelFormat DrawableFormat(TZmPixelFormat format) {
    switch (format) {
        case zm1g:
        case zm8p:
        case zm8g:
        case zm32RGB: return format;
        default: return zm24RGB;
    }
}

/// The part of a rectangle that lies in an image; right and bottom at most left and top when
/// there is none.
TRect ClipToImage(const TRect& rect, std::int32_t width, std::int32_t height) {
    return TRect{std::max(rect.left, 0), std::max(rect.top, 0), std::min(rect.right, width),
                 std::min(rect.bottom, height)};
}

/// Stores the pixels of `drawn` that differ from what the row at `x` holds, and only these: a way
/// through eight bits would cost the others their depth.
void StoreChangedPixels(const TRGB* drawn, std::uint8_t* row, std::int32_t x, std::int32_t count,
                        const TZmRowLayout& layout) {
    std::array<TRGB, kRunPixels> present;
    for (std::int32_t first = 0; first < count; first += kRunPixels) {
        const std::int32_t length = std::min(kRunPixels, count - first);
        LoadRGBPixels(row, x + first, length, layout, present.data());
        for (std::int32_t i = 0; i < length; ++i) {
            if (drawn[first + i] != present[static_cast<std::size_t>(i)]) {
                StoreRGBPixels(drawn + first + i, row, x + first + i, 1, layout);
            }
        }
    }
}

/// Puts the pixels of a drawn copy back where they came from.
void ReturnPixels(TZmBitmap& region, TZmBitmap& original, const TZmRowLayout& original_layout,
                  std::int32_t left, std::int32_t top) {
    const std::int32_t width = region.GetWidth();
    const std::int32_t height = region.GetHeight();
    if (region.GetPixelFormat() == original_layout.format) {
        region.CopyRectTo(&original, 0, 0, left, top, width, height, /*copy_alpha=*/false);
        return;
    }
    const TRect rect{left, top, SaturateToInt32(std::int64_t{left} + width),
                     SaturateToInt32(std::int64_t{top} + height)};
    const TRect part = ClipToImage(rect, original.GetWidth(), original.GetHeight());
    if (region.GetPixelFormat() != zm24RGB || part.left >= part.right) {
        return;  // beside the image, or no copy any more: the region was given another format
    }
    for (std::int32_t y = part.top; y < part.bottom; ++y) {
        const std::uint8_t* const drawn = region.GetScanLine(y - top);
        std::uint8_t* const row = original.GetScanLine(y);
        if (drawn != nullptr && row != nullptr) {
            StoreChangedPixels(reinterpret_cast<const TRGB*>(drawn) + (part.left - left), row,
                               part.left, part.right - part.left, original_layout);
        }
    }
    original.Changed();
}

}  // namespace

void TCanvasDeleter::operator()(TCanvas* canvas) const {
    delete canvas;
}

void TZmCanvasDeleter::operator()(TZmCanvas* canvas) const {
    delete canvas;
}

TCanvas* TZmBitmapSurface::GetCanvas() {
    auto& image = static_cast<TZmBitmap&>(*this);
    if (image.IsEmpty() || image.GetIsVirtual()) {
        return nullptr;
    }
    image.SetLocation(zmTBitmap);
    if (fLocation != zmTBitmap || fBitmap == nullptr) {
        return nullptr;
    }
    if (fCanvas == nullptr) {
        fCanvas.reset(new TCanvas(*fBitmap, fCanvasFont));
    }
    return fCanvas.get();
}

TZmCanvas* TZmBitmapSurface::GetZmCanvas() {
    TCanvas* const canvas = GetCanvas();
    if (canvas != nullptr && fZmCanvas == nullptr) {
        fZmCanvas.reset(new TZmCanvas(*canvas, /*AntiAlias=*/true, /*UseGDIPlus=*/true));
    }
    return canvas == nullptr ? nullptr : fZmCanvas.get();
}

// Regions.

std::unique_ptr<TZmBitmap> TZmBitmapSurface::CreateROIBitmap(const TRect& Rect,
                                                             bool PerformAlphaCompositing) {
    auto& image = static_cast<TZmBitmap&>(*this);
    const std::int64_t width = std::int64_t{Rect.right} - Rect.left;
    const std::int64_t height = std::int64_t{Rect.bottom} - Rect.top;
    auto region = std::make_unique<TZmBitmap>();
    region->SetLocation(zmTBitmap);  // whose pixels are all 0 at first
    if (image.IsEmpty() || image.GetIsVirtual() || width > kMaxInt32 || height > kMaxInt32 ||
        !region->Allocate(static_cast<std::int32_t>(width), static_cast<std::int32_t>(height),
                          PerformAlphaCompositing ? zm32RGB : DrawableFormat(fPixelFormat))) {
        return nullptr;
    }
    if (!PerformAlphaCompositing) {
        if (fPixelFormat == zm8p) {
            image.CopyPaletteTo(region.get());
        }
        const TRect part = ClipToImage(Rect, fWidth, fHeight);
        if (part.left < part.right && part.top < part.bottom) {
            image.CopyRectTo(region.get(), part.left, part.top, part.left - Rect.left,
                             part.top - Rect.top, part.right - part.left, part.bottom - part.top,
                             /*copy_alpha=*/false);
        }
    }
    region->fROIOriginalBitmap = &image;
    region->fROIOriginalRect = Rect;
    region->fROIAlphaCompositing = PerformAlphaCompositing;
    return region;
}

std::unique_ptr<TZmCanvas, TZmCanvasDeleter> TZmBitmapSurface::CreateROICanvas(
    const TRect& Rect, bool AntiAlias, bool UseGDIPlus, bool PerformAlphaCompositing) {
    std::unique_ptr<TZmBitmap> region = CreateROIBitmap(Rect, PerformAlphaCompositing);
    TCanvas* const canvas = region == nullptr ? nullptr : region->GetCanvas();
    if (canvas == nullptr) {
        return nullptr;
    }
    std::unique_ptr<TZmCanvas, TZmCanvasDeleter> result(
        new TZmCanvas(*canvas, AntiAlias, UseGDIPlus));
    result->SetROIBitmap(std::move(region));
    return result;
}

void TZmBitmapSurface::FinishROI() {
    auto& region = static_cast<TZmBitmap&>(*this);
    TZmBitmap* const original = std::exchange(fROIOriginalBitmap, nullptr);
    if (original == nullptr) {
        return;
    }
    region.DropCanvases();  // with which the last drawing reaches the pixels
    if (fROIAlphaCompositing) {
        original->MergeWithAlpha(&region, fROIOriginalRect.left, fROIOriginalRect.top,
                                 kNoTransparency, kFullOpacity);
    } else if (!region.IsEmpty() && !original->IsEmpty()) {
        ReturnPixels(region, *original, original->GetRowLayout(), fROIOriginalRect.left,
                     fROIOriginalRect.top);
    }
}

}  // namespace zm
