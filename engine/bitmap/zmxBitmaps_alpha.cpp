/// The alpha plane: a second bitmap of zm8g that the image owns.

#include <algorithm>
#include <cstring>
#include <utility>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// Takes the background by the alpha: 255 ends 255/256 of the way from it to the pixel.
void MergeRow(std::uint8_t* pixels, const std::uint8_t* alpha, std::int32_t width,
              TRGB background) {
    const int backgrounds[3] = {background.b, background.g, background.r};
    for (std::int32_t x = 0; x < width; ++x) {
        const std::int32_t weight = alpha[x] * 1024;
        for (const int ground : backgrounds) {
            *pixels = static_cast<std::uint8_t>((((*pixels - ground) * weight) >> 18) + ground);
            ++pixels;
        }
    }
}

bool IsOpaqueRow(const std::uint8_t* alpha, std::int64_t byte_count) {
    unsigned all = 255;
    for (std::int64_t i = 0; i < byte_count; ++i) {
        all &= alpha[i];
    }
    return all == 255;
}

/// Row of a mask to alpha bytes; a set bit is opaque.
void AlphaFromMaskRow(const std::uint8_t* mask_row, std::int32_t bits_per_pixel,
                      std::uint8_t* alpha, std::int32_t width) {
    if (bits_per_pixel == 8) {
        std::memcpy(alpha, mask_row, static_cast<std::size_t>(width));
        return;
    }
    for (std::int32_t x = 0; x < width; ++x) {
        alpha[x] = (mask_row[x >> 3] >> (7 - (x & 7)) & 1) != 0 ? 255 : 0;
    }
}

}  // namespace

std::unique_ptr<TZmBitmap> TZmBitmap::CreateAsAlphaChannel(std::int32_t width, std::int32_t height,
                                                           TZmLocation location) {
    auto plane = std::make_unique<TZmBitmap>();
    plane->fIsAlpha = true;
    plane->fLocation = location == zmTBitmap ? zmMemory : location;
    if (plane->Allocate(width, height, zm8g)) {
        plane->Fill(255.0);
    }
    return plane;
}

TZmBitmap* TZmBitmap::GetAlphaChannel() {
    if (!fIsAlpha && fAlphaChannel == nullptr) {
        fAlphaChannel = CreateAsAlphaChannel(GetWidth(), fHeight, fLocation);
    }
    return fAlphaChannel.get();
}

void TZmBitmap::RemoveAlphaChannel(bool merge, TColor background) {
    if (fIsAlpha || fAlphaChannel == nullptr) {
        return;
    }
    TZmBitmap& plane = *fAlphaChannel;
    if (merge && GetPixelFormat() == zm24RGB && plane.fPixelFormat == zm8g && !fIsVirtual) {
        const std::int32_t width = std::min(fWidth, plane.fWidth);
        const std::int32_t height = std::min(fHeight, plane.fHeight);
        for (std::int32_t y = 0; y < height; ++y) {
            MergeRow(GetScanLine(y), plane.GetScanLine(y), width, RGBFromColor(background));
        }
    }
    fAlphaChannel.reset();
    Changed();
}

void TZmBitmap::ReplaceAlphaChannel(std::unique_ptr<TZmBitmap> plane) {
    if (fIsAlpha || plane.get() == this) {
        return;
    }
    fAlphaChannel = std::move(plane);
    if (fAlphaChannel != nullptr) {
        fAlphaChannel->fIsAlpha = true;
        fAlphaChannel->fAlphaChannel.reset();
    }
    Changed();
}

std::unique_ptr<TZmBitmap> TZmBitmap::DetachAlphaChannel(bool create_if_not_exists) {
    if (create_if_not_exists) {
        GetAlphaChannel();
    }
    std::unique_ptr<TZmBitmap> plane = std::move(fAlphaChannel);
    Changed();
    return plane;
}

void TZmBitmap::SyncFull() {
    const std::int64_t used_bytes = (std::int64_t{GetWidth()} * fBitCount + 7) / 8;
    bool is_full = true;
    for (std::int32_t y = 0; is_full && y < fHeight; ++y) {
        const std::uint8_t* const row = GetScanLine(y);
        is_full = row != nullptr && IsOpaqueRow(row, used_bytes);
    }
    fFull = is_full;
}

void TZmBitmap::SynchronizeRGBA(bool rgba_to_alpha, bool update_pixel_format) {
    if (rgba_to_alpha) {
        CopyRGBAToPlane();
        if (update_pixel_format && GetPixelFormat() == zm32RGB) {
            SetPixelFormat(zm24RGB);
        }
    } else {
        if (update_pixel_format) {
            SetPixelFormat(zm32RGB);
        }
        CopyPlaneToRGBA();
    }
    Changed();
}

/// A plane of another size is made anew, since every pixel gets its value.
void TZmBitmap::CopyRGBAToPlane() {
    TZmBitmap* const plane = GetPixelFormat() == zm32RGB ? GetAlphaChannel() : nullptr;
    if (plane == nullptr || !plane->Allocate(fWidth, fHeight, zm8g)) {
        return;
    }
    plane->fFull = true;
    for (std::int32_t y = 0; y < fHeight; ++y) {
        const std::uint8_t* const pixels = GetScanLine(y);
        std::uint8_t* const alpha = plane->GetScanLine(y);
        if (pixels == nullptr || alpha == nullptr) {
            continue;
        }
        for (std::int32_t x = 0; x < fWidth; ++x) {
            alpha[x] = pixels[4 * std::int64_t{x} + 3];
        }
        plane->fFull = plane->fFull && IsOpaqueRow(alpha, fWidth);
    }
}

/// Pixels that no plane covers are opaque.
void TZmBitmap::CopyPlaneToRGBA() {
    if (GetPixelFormat() != zm32RGB || fIsVirtual || IsEmpty()) {
        return;
    }
    TZmBitmap* const plane = fAlphaChannel.get();
    const bool has_plane = plane != nullptr && plane->fPixelFormat == zm8g;
    for (std::int32_t y = 0; y < fHeight; ++y) {
        std::uint8_t* const pixels = GetScanLine(y);
        const bool is_covered = has_plane && y < plane->fHeight;
        const std::uint8_t* const alpha = is_covered ? plane->GetScanLine(y) : nullptr;
        const std::int32_t covered = is_covered ? std::min(fWidth, plane->fWidth) : 0;
        for (std::int32_t x = 0; x < covered; ++x) {
            pixels[4 * x + 3] = alpha[x];
        }
        for (std::int32_t x = covered; x < fWidth; ++x) {
            pixels[4 * x + 3] = 255;
        }
    }
}

void TZmBitmap::AlphaFill(std::int32_t value) {
    TZmBitmap* const plane = GetAlphaChannel();
    if (plane != nullptr) {
        plane->Fill(static_cast<double>(value));
        plane->fFull = (value & 255) == 255;
    }
}

// Masks.

void TZmBitmap::CopyFromTZmMask(TZmMask& source) {
    TZmBitmap* const plane = fIsAlpha ? this : GetAlphaChannel();
    if (plane == nullptr || plane->GetPixelFormat() != zm8g) {
        return;
    }
    const std::int32_t width = std::min(plane->fWidth, source.GetWidth());
    const std::int32_t height = std::min(plane->fHeight, source.GetHeight());
    for (std::int32_t y = 0; y < height; ++y) {
        const std::uint8_t* const mask_row = source.GetScanLine(y);
        if (mask_row == nullptr) {
            break;
        }
        AlphaFromMaskRow(mask_row, source.GetBitsPerPixel(), plane->GetScanLine(y), width);
    }
    plane->SyncFull();
}

void TZmBitmap::CopyToTZmMask(TZmMask& dest) {
    TZmBitmap* const plane = fIsAlpha ? this : fAlphaChannel.get();
    if (!dest.AllocateBits(GetWidth(), fHeight, 8)) {
        return;
    }
    dest.Fill(255);
    if (plane == nullptr || plane->GetPixelFormat() != zm8g) {
        return;
    }
    const auto width = static_cast<std::size_t>(std::min(plane->fWidth, fWidth));
    for (std::int32_t y = 0; y < std::min(plane->fHeight, fHeight); ++y) {
        std::uint8_t* const mask_row = dest.GetScanLine(y);
        const std::uint8_t* const alpha = plane->GetScanLine(y);
        if (mask_row == nullptr || alpha == nullptr) {
            return;
        }
        std::memcpy(mask_row, alpha, width);
    }
    dest.SyncRect();
    dest.SyncFull();
}

}  // namespace zm
