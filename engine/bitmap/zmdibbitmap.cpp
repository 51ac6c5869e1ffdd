#include "engine/bitmap/zmdibbitmap.h"

#include <algorithm>
#include <cstring>

#include "engine/bitmap/zmdib.h"
#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kAlignmentBits = 32;
// The header tells the size of the pixels in 32 bits.
constexpr std::int64_t kMostPixelBytes = kMaxInt32;

std::vector<TRGB> PaletteOfDepth(std::int32_t bit_count) {
    if (bit_count == 1) {
        return {TRGB{}, TRGB{255, 255, 255}};
    }
    std::vector<TRGB> palette(bit_count == 8 ? 256 : 0);
    for (std::size_t i = 0; i < palette.size(); ++i) {
        const auto value = static_cast<std::uint8_t>(i);
        palette[i] = TRGB{value, value, value};
    }
    return palette;
}

TZmPixelFormat FormatOfDepth(std::int32_t bit_count) {
    switch (bit_count) {
        case 1: return zm1g;
        case 8: return zm8g;
        case 24: return zm24RGB;
        default: return zmnull;
    }
}

TBitmapPixelFormat TBitmapFormatOfDepth(std::int32_t bit_count) {
    switch (bit_count) {
        case 1: return pf1bit;
        case 8: return pf8bit;
        default: return pf24bit;
    }
}

}  // namespace

TZmDibbitmap::TZmDibbitmap() = default;

TZmDibbitmap::~TZmDibbitmap() = default;

bool TZmDibbitmap::AllocateBits(std::int32_t BmpWidth, std::int32_t BmpHeight,
                                std::int32_t BmpBitCount) {
    FreeBits();
    if (BmpWidth < 1 || BmpHeight < 1 || FormatOfDepth(BmpBitCount) == zmnull) {
        return false;
    }
    const auto row_len = CalcRowLen(BmpWidth, BmpBitCount, kAlignmentBits);
    if (!row_len || *row_len > kMostPixelBytes / BmpHeight) {
        return false;
    }
    std::vector<TRGB> palette = PaletteOfDepth(BmpBitCount);
    const std::vector<std::uint8_t> info =
        MakeDibInfo(BmpWidth, BmpHeight, BmpBitCount, palette, /*dpi_x=*/0, /*dpi_y=*/0);
    section_ =
        platform::TDibSection::Create(info.data(), static_cast<std::size_t>(*row_len * BmpHeight));
    if (section_ == nullptr) {
        return false;
    }
    fBits = section_->Bits();
    fWidth = BmpWidth;
    fHeight = BmpHeight;
    fBitCount = BmpBitCount;
    fRowLen = static_cast<std::uint32_t>(*row_len);
    palette_ = std::move(palette);
    return true;
}

void TZmDibbitmap::FreeBits() {
    section_.reset();
    fBits = nullptr;
    fWidth = 0;
    fHeight = 0;
    fBitCount = 0;
    fRowLen = 0;
    palette_.clear();
}

void TZmDibbitmap::CopyToTBitmap(TBitmap* Dest) {
    if (Dest == nullptr || !Dest->SetSize(fWidth, fHeight, TBitmapFormatOfDepth(fBitCount))) {
        return;
    }
    std::copy(palette_.begin(), palette_.end(), Dest->ColorTable().begin());
    for (std::int32_t y = 0; y < fHeight; ++y) {
        std::memcpy(Dest->GetScanLine(y), GetScanLine(y), fRowLen);
    }
    Dest->SetModified(true);
}

void* TZmDibbitmap::GetHDC() const {
    return section_ == nullptr ? nullptr : section_->DeviceContext();
}

void* TZmDibbitmap::GetDIB() const {
    return section_ == nullptr ? nullptr : section_->Handle();
}

std::uint8_t* TZmDibbitmap::GetBits() {
    return section_ == nullptr ? nullptr : section_->Bits();
}

std::uint8_t* TZmDibbitmap::GetScanLine(std::int32_t row) {
    ZM_ASSERT(row >= 0 && row < fHeight);
    return fBits == nullptr ? nullptr
                            : fBits + static_cast<std::size_t>(fHeight - row - 1) * fRowLen;
}

void TZmDibbitmap::SetWidth(std::int32_t) {
    throw EZmException("Cannot resize TZmDibBitmap");
}

void TZmDibbitmap::SetHeight(std::int32_t) {
    throw EZmException("Cannot resize TZmDibBitmap");
}

TZmPixelFormat TZmDibbitmap::GetPixelFormat() {
    return FormatOfDepth(fBitCount);
}

TRGB TZmDibbitmap::GetPalette(std::int32_t index) {
    const auto entry = static_cast<std::size_t>(index);
    return index >= 0 && entry < palette_.size() ? palette_[entry] : TRGB{};
}

std::int32_t TZmDibbitmap::GetPaletteLen() {
    return static_cast<std::int32_t>(palette_.size());
}

bool TZmDibbitmap::Allocate(std::int32_t width, std::int32_t height, TZmPixelFormat format) {
    if (format != zm1g && format != zm24RGB) {
        FreeBits();
        return false;
    }
    return AllocateBits(width, height, format == zm1g ? 1 : 24);
}

bool TZmDibbitmap::Allocate(std::int32_t width, std::int32_t height, TColor fill_color,
                            std::int32_t) {
    if (!AllocateBits(width, height, 24)) {
        return false;
    }
    const TRGB color = RGBFromColor(fill_color);
    for (std::int32_t y = 0; y < fHeight; ++y) {
        std::uint8_t* pixel = GetScanLine(y);
        for (std::int32_t x = 0; x < fWidth; ++x, pixel += 3) {
            std::memcpy(pixel, &color, sizeof color);
        }
    }
    return true;
}

void TZmDibbitmap::Assign(TZmBaseBitmap* source) {
    if (source == nullptr || source == this) {
        return;
    }
    const std::int32_t bit_count = source->GetBitCount();
    const bool is_held =
        source->GetPixelFormat() != zmnull && source->GetPixelFormat() == FormatOfDepth(bit_count);
    if (!is_held || !AllocateBits(source->GetWidth(), source->GetHeight(), bit_count)) {
        FreeBits();
        return;
    }
    const auto used_bytes = static_cast<std::size_t>((std::int64_t{fWidth} * fBitCount + 7) / 8);
    for (std::int32_t y = 0; y < fHeight; ++y) {
        const std::uint8_t* const from = source->GetScanLine(y);
        if (from != nullptr) {
            std::memcpy(GetScanLine(y), from, used_bytes);
        }
    }
}

void TZmDibbitmap::CopyPaletteTo(TZmBaseBitmap* dest) {
    if (dest == nullptr || dest == this) {
        return;
    }
    for (std::int32_t i = 0; i < GetPaletteLen(); ++i) {
        dest->SetPalette(i, GetPalette(i));
    }
    if (!palette_.empty()) {
        dest->SetPaletteUsed(GetPaletteLen());
    }
}

// The exchange with TZmBitmap.

bool TZmBitmap::CopyFromTDibBitmap(TZmDibbitmap* source) {
    if (source == nullptr || source->GetBits() == nullptr || fIsVirtual) {
        return false;
    }
    TZmBitmap pixels;
    pixels.EncapsulateMemory(source->GetBits(), source->GetWidth(), source->GetHeight(),
                             source->GetPixelFormat(), /*do_free_image=*/false, zmboBOTTOMLEFT);
    TZmBitmap copy;
    copy.fMinFileSize = fMinFileSize;
    copy.fMemoryAllocator = fMemoryAllocator;
    copy.fOrigin = fOrigin;
    if (!copy.Allocate(pixels.fWidth, pixels.fHeight, pixels.fPixelFormat)) {
        return false;
    }
    copy.CopyPixelsFrom(&pixels);
    return TakeCropped(copy);
}

bool TZmBitmap::CopyToTDibBitmap(TZmDibbitmap* dest, std::int32_t source_x, std::int32_t source_y,
                                 std::int32_t sourceWidth, std::int32_t sourceHeight) {
    if (dest == nullptr || !dest->AllocateBits(sourceWidth, sourceHeight, GetBitCount())) {
        return false;
    }
    TZmBitmap pixels;
    pixels.EncapsulateMemory(dest->GetBits(), sourceWidth, sourceHeight, dest->GetPixelFormat(),
                             /*do_free_image=*/false, zmboBOTTOMLEFT);
    // The part that the image has, in its place.
    const std::int64_t left = std::max(source_x, 0);
    const std::int64_t top = std::max(source_y, 0);
    const std::int64_t width =
        std::min(std::int64_t{source_x} + sourceWidth, std::int64_t{fWidth}) - left;
    const std::int64_t height =
        std::min(std::int64_t{source_y} + sourceHeight, std::int64_t{fHeight}) - top;
    if (width > 0 && height > 0) {
        CopyRectTo(&pixels, static_cast<std::int32_t>(left), static_cast<std::int32_t>(top),
                   static_cast<std::int32_t>(left - source_x),
                   static_cast<std::int32_t>(top - source_y), static_cast<std::int32_t>(width),
                   static_cast<std::int32_t>(height), /*copy_alpha=*/false);
    }
    return true;
}

void TZmBitmap::MergeFromTDibBitmap(TZmDibbitmap* source, std::int32_t x, std::int32_t y) {
    if (source == nullptr || source->GetBits() == nullptr) {
        return;
    }
    TZmBitmap pixels;
    pixels.EncapsulateMemory(source->GetBits(), source->GetWidth(), source->GetHeight(),
                             source->GetPixelFormat(), /*do_free_image=*/false, zmboBOTTOMLEFT);
    pixels.CopyRectTo(this, 0, 0, x, y, pixels.fWidth, pixels.fHeight, /*copy_alpha=*/false);
}

}  // namespace zm
