// Copies from and to platform bitmaps.

#include <cstring>
#include <memory>
#include <utility>
#include <vector>

#include "engine/bitmap/zmimagelist.h"
#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"

namespace zm {
namespace {

/// The layout that holds a format as it is; pfNone for formats that are converted. Raises for
/// those that are not.
TBitmapPixelFormat LayoutFor(TZmPixelFormat format) {
    switch (format) {
        case zm1g: return pf1bit;
        case zm8p:
        case zm8g: return pf8bit;
        case zm24RGB: return pf24bit;
        case zm32RGB: return pf32bit;
        case zmCMYK: throw EZmException("CMYK to TBitmap not supported");
        case zm48RGB: throw EZmException("RGB48 to TBitmap not supported");
        case zmCIELab: throw EZmException("CIELab to TBitmap not supported");
        default: return pfNone;
    }
}

void SetColorTable(TZmBitmap& source, TBitmap& dest) {
    std::vector<TRGB>& colors = dest.ColorTable();
    if (source.GetPixelFormat() == zm1g) {
        colors[0] = TRGB{};
        colors[1] = TRGB{255, 255, 255};
        return;
    }
    for (std::size_t i = 0; i < colors.size(); ++i) {
        const auto value = static_cast<std::uint8_t>(i);
        colors[i] = source.GetPixelFormat() == zm8p
                        ? source.GetPalette(static_cast<std::int32_t>(i))
                        : TRGB{value, value, value};
    }
}

}  // namespace

/// Nil does nothing; else this becomes a copy, without alpha: zm1g, zm8p, zm24RGB or zm32RGB by
/// the source's layout.
void TZmBitmapSurface::CopyFromTBitmap(TBitmap* Source) {
    auto& bitmap = static_cast<TZmBitmap&>(*this);
    if (Source == nullptr) {
        return;
    }
    if (bitmap.GetLocation() == zmTBitmap && fBitmap == Source) {
        bitmap.UpdateFromTBitmap();  // it is the image already
        return;
    }
    TZmBitmap borrowed;
    borrowed.EncapsulateTBitmap(Source, /*do_free_image=*/false);
    bitmap.AssignImage(&borrowed);
}

/// Nil does nothing; else it takes the image's size and the layout of its format, zm16g and zm32f
/// by way of zm8g, alpha left out. Without room it is empty afterwards.
void TZmBitmapSurface::CopyToTBitmap(TBitmap* Dest) {
    auto& bitmap = static_cast<TZmBitmap&>(*this);
    if (Dest == nullptr || (bitmap.GetLocation() == zmTBitmap && fBitmap == Dest)) {
        return;
    }
    const std::int32_t width = bitmap.GetWidth();
    const std::int32_t height = bitmap.GetHeight();
    const TBitmapPixelFormat layout = LayoutFor(bitmap.GetPixelFormat());
    if (layout == pfNone && !bitmap.IsEmpty()) {
        TZmBitmap gray;
        if (gray.Allocate(width, height, zm8g)) {
            gray.CopyAndConvertFormat(&bitmap);
        }
        gray.CopyToTBitmap(Dest);
        return;
    }
    if (!Dest->SetSize(width, height, layout)) {
        return;
    }
    SetColorTable(bitmap, *Dest);
    const auto used_bytes = static_cast<std::size_t>(
        (std::int64_t{width} * PixelFormatInfo(bitmap.GetPixelFormat()).bit_count + 7) / 8);
    for (std::int32_t y = 0; y < height; ++y) {
        if (const std::uint8_t* const row = bitmap.GetScanLine(y); row != nullptr) {
            std::memcpy(Dest->GetScanLine(y), row, used_bytes);
        }
    }
    Dest->SetModified(true);
}

std::int32_t TZmBitmapSurface::AddToImageList(TImageList* Dest) {
    if (Dest == nullptr) {
        return -1;
    }
    auto picture = std::make_unique<TBitmap>();
    CopyToTBitmap(picture.get());
    return picture->GetWidth() > 0 ? Dest->Add(std::move(picture)) : -1;
}

}  // namespace zm
