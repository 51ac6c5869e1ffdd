/// Construction, what describes an image, the palette, copies and hand-over.

#include "engine/bitmap/zmxBitmaps.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmrunmover_p.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/platform/memory.h"

namespace zm {
namespace {

constexpr std::int64_t kMinFileSizeUnknownMemory = 33554432;
constexpr std::size_t kPaletteEntries = 256;

/// Smallest image in bytes that goes to disk, by the settings or the machine's memory.
std::int64_t DefaultMinFileSize() {
    const std::int64_t setting = ZmGlobalSettings().fDefMinFileSize;
    if (setting >= 0) {
        return setting;
    }
    const std::int64_t memory = platform::PhysicalMemoryBytes();
    return memory > 0 ? static_cast<std::int64_t>(static_cast<double>(memory) / 1.1)
                      : kMinFileSizeUnknownMemory;
}

}  // namespace

TZmBitmapState::TZmBitmapState()
    : fmemmap(std::make_unique<TZmFileBuffer>()), fMinFileSize(DefaultMinFileSize()) {}

TZmBitmapState::~TZmBitmapState() = default;

TZmBitmap::TZmBitmap() = default;

TZmBitmap::TZmBitmap(std::int32_t width, std::int32_t height, TZmPixelFormat format) : TZmBitmap() {
    Allocate(width, height, format);
}

TZmBitmap::TZmBitmap(TZmBitmap& source) : TZmBitmap() {
    AssignEx(&source, /*with_params=*/true);
}

TZmBitmap::TZmBitmap(TZmBitmap& source, const TRect& rect) : TZmBitmap() {
    const std::int64_t width = std::int64_t{rect.right} - rect.left;
    const std::int64_t height = std::int64_t{rect.bottom} - rect.top;
    CopySettingsFrom(source);
    if (Allocate(SaturateToInt32(width), SaturateToInt32(height), source.GetPixelFormat())) {
        if (fPixelFormat == zm8p) {
            source.CopyPaletteTo(this);
        }
        source.CopyRectTo(this, rect.left, rect.top, 0, 0, fWidth, fHeight, /*copy_alpha=*/true);
    }
}

TZmBitmap::TZmBitmap(TBitmap& source) : TZmBitmap() {
    TZmBitmap borrowed;
    borrowed.EncapsulateTBitmap(&source, /*do_free_image=*/false);
    AssignEx(&borrowed, /*with_params=*/false);
}

TZmBitmap::TZmBitmap(TBitmap& source, const TRect& rect) : TZmBitmap() {
    TZmBitmap borrowed;
    borrowed.EncapsulateTBitmap(&source, /*do_free_image=*/false);
    TZmBitmap part(borrowed, rect);
    part.SwitchTo(this);
}

TZmBitmap::TZmBitmap(void* memory, std::int32_t width, std::int32_t height, TZmPixelFormat format)
    : TZmBitmap() {
    EncapsulateMemory(memory, width, height, format, /*do_free_image=*/false, zmboTOPLEFT);
}

TZmBitmap::~TZmBitmap() {
    FinishROI();
    FreeImage(/*free_alpha=*/true);
}

// Size and format.

std::int32_t TZmBitmap::GetBitCount() {
    UpdateFromTBitmap();
    return fBitCount;
}

std::int32_t TZmBitmap::GetChannelCount() {
    UpdateFromTBitmap();
    return fChannelCount;
}

std::int32_t TZmBitmap::GetHeight() {
    UpdateFromTBitmap();
    return fHeight;
}

std::int32_t TZmBitmap::GetWidth() {
    UpdateFromTBitmap();
    return fWidth;
}

TZmPixelFormat TZmBitmap::GetPixelFormat() {
    UpdateFromTBitmap();
    return fPixelFormat;
}

std::int64_t TZmBitmap::GetRowLen() {
    UpdateFromTBitmap();
    return fRowLen;
}

bool TZmBitmap::IsEmpty() {
    UpdateFromTBitmap();
    return fWidth == 0 || fHeight == 0 || fRowLen == 0 || fBitCount == 0;
}

// Palette.

TRGB TZmBitmap::GetPalette(std::int32_t index) {
    const auto entry = static_cast<std::size_t>(index);
    return index >= 0 && entry < fRGBPalette.size() ? fRGBPalette[entry] : TRGB{};
}

void TZmBitmap::SetPalette(std::int32_t index, TRGB value) {
    const auto entry = static_cast<std::size_t>(index);
    if (index < 0 || entry >= fRGBPalette.size()) {
        return;
    }
    fRGBPalette[entry] = value;
    if (fLocation == zmTBitmap && fBitmap != nullptr) {
        fBitmap->ColorTable()[entry] = value;
    }
    Changed();
}

std::int32_t TZmBitmap::GetPaletteLen() {
    return static_cast<std::int32_t>(fRGBPalette.size());
}

void TZmBitmap::SetPaletteUsed(std::int32_t count) {
    fPaletteUsed = std::clamp(count, 0, 256);
}

void TZmBitmap::CopyPaletteTo(TZmBaseBitmap* dest) {
    if (dest == nullptr || dest == this) {
        return;
    }
    if (auto* const bitmap = dynamic_cast<TZmBitmap*>(dest)) {
        bitmap->fRGBPalette = fRGBPalette;
        if (bitmap->fPixelFormat == zm8p) {
            bitmap->fRGBPalette.resize(kPaletteEntries);
        }
        bitmap->UpdateTBitmapPalette();
    } else {
        for (std::size_t i = 0; i < fRGBPalette.size(); ++i) {
            dest->SetPalette(static_cast<std::int32_t>(i), fRGBPalette[i]);
        }
    }
    dest->SetPaletteUsed(fPaletteUsed);
}

void TZmBitmap::SetGrayPalette() {
    fRGBPalette.resize(kPaletteEntries);
    for (std::size_t i = 0; i < kPaletteEntries; ++i) {
        const auto value = static_cast<std::uint8_t>(i);
        fRGBPalette[i] = TRGB{value, value, value};
    }
    UpdateTBitmapPalette();
}

void TZmBitmap::UpdateTBitmapPalette() {
    if (fLocation == zmTBitmap && fBitmap != nullptr && fPixelFormat == zm8p) {
        fRGBPalette.resize(kPaletteEntries);
        fBitmap->ColorTable() = fRGBPalette;
    }
}

// Copies.

void TZmBitmap::Assign(TZmBaseBitmap* source) {
    AssignEx(source, /*with_params=*/true);
}

void TZmBitmap::AssignImage(TZmBaseBitmap* source) {
    AssignEx(source, /*with_params=*/false);
}

void TZmBitmap::CopySettingsFrom(const TZmBitmap& source) {
    SetBitAlignment(source.fBitAlignment);
    fDefaultDitherMethod = source.fDefaultDitherMethod;
    fBlackValue = source.fBlackValue;
    fWhiteValue = source.fWhiteValue;
    fChannelOffset = source.fChannelOffset;
    fEnableChannelOffset = source.fEnableChannelOffset;
    fContrast = source.fContrast;
}

void TZmBitmap::CopyPixelsFrom(TZmBaseBitmap* source) {
    if (fIsVirtual) {
        return;  // its rows are rendered, not kept
    }
    const auto* const bitmap = dynamic_cast<const TZmBitmap*>(source);
    const bool is_rendered = bitmap != nullptr && bitmap->fIsVirtual;
    // Rows of virtual bitmaps may end with their last pixel, or within rows of another bitmap.
    const std::int64_t used_bytes = (std::int64_t{fWidth} * fBitCount + 7) / 8;
    const auto row_bytes =
        static_cast<std::size_t>(is_rendered ? used_bytes : std::min(fRowLen, source->GetRowLen()));
    const bool is_upward = IsStoredBottomUp(*this) && !is_rendered;
    for (std::int32_t i = 0; i < fHeight; ++i) {
        const std::int32_t y = is_upward ? fHeight - 1 - i : i;
        const std::uint8_t* const from = source->GetScanLine(y);
        std::uint8_t* const to = GetScanLine(y);
        if (from != nullptr && to != nullptr) {
            std::memcpy(to, from, row_bytes);
        }
    }
}

void TZmBitmap::AssignAlphaFrom(TZmBitmap& source) {
    if (fIsAlpha) {
        return;
    }
    TZmBitmap* const plane = source.fAlphaChannel.get();
    if (plane == nullptr) {
        fAlphaChannel.reset();
        return;
    }
    if (fAlphaChannel == nullptr) {
        fAlphaChannel = std::make_unique<TZmBitmap>();
        fAlphaChannel->fIsAlpha = true;
        fAlphaChannel->fLocation = fLocation == zmTBitmap ? zmMemory : fLocation;
        fAlphaChannel->fMinFileSize = fMinFileSize;
    }
    fAlphaChannel->AssignEx(plane, /*with_params=*/false);
}

void TZmBitmap::AssignEx(TZmBaseBitmap* source, bool with_params) {
    if (source == nullptr || source == this) {
        return;
    }
    auto* const bitmap = dynamic_cast<TZmBitmap*>(source);
    if (bitmap != nullptr) {
        CopySettingsFrom(*bitmap);
    }
    const TZmPixelFormat format = source->GetPixelFormat();
    if (!Allocate(source->GetWidth(), source->GetHeight(), format)) {
        FreeImage(/*free_alpha=*/true);
        fPixelFormat = format;
    } else if (fPixelFormat != format && bitmap != nullptr) {
        ConvertPixelsFrom(*bitmap);  // a platform bitmap has no 16-bit grey
    } else {
        CopyPixelsFrom(source);
        source->CopyPaletteTo(this);
    }
    if (bitmap != nullptr) {
        fFull = fIsAlpha && bitmap->fFull;
        AssignAlphaFrom(*bitmap);
        if (with_params) {
            fFilename = bitmap->fFilename;
            fFileType = bitmap->fFileType;
            AssignParamsFrom(*bitmap);
        }
    }
    Changed();
}

// Hand-over.

/// Everything that describes the pixels, the alpha plane and the events excepted. This object
/// holds no pixels; `source` is left empty and ready.
void TZmBitmap::MovePixelsFrom(TZmBitmap& source) {
    fWidth = source.fWidth;
    fHeight = source.fHeight;
    fPixelFormat = source.fPixelFormat;
    fBitCount = source.fBitCount;
    fChannelCount = source.fChannelCount;
    fRowLen = source.fRowLen;
    fRGBPalette = std::exchange(source.fRGBPalette, {});
    fPaletteUsed = source.fPaletteUsed;
    fFull = source.fFull;
    fMemory = source.fMemory;
    fRealMemory = source.fRealMemory;
    fRealMemorySize = source.fRealMemorySize;
    fRealMemoryAllocator = source.fRealMemoryAllocator;
    fEncapsulatedFromTBitmap = source.fEncapsulatedFromTBitmap;
    fEncapsulatedFromMemory = source.fEncapsulatedFromMemory;
    fLocation = source.fLocation;
    fBitmap = source.fBitmap;
    fOwnedBitmap = std::move(source.fOwnedBitmap);
    fBitmapScanlines = std::exchange(source.fBitmapScanlines, {});
    fFragmentsCount = source.fFragmentsCount;
    fRowsPerFragment = source.fRowsPerFragment;
    fFragments = std::exchange(source.fFragments, {});
    fOrigin = source.fOrigin;
    std::swap(fmemmap, source.fmemmap);  // the one of this object holds no file
    fWorkingMap = source.fWorkingMap;
    fScanlinesToUnMapPtr = std::exchange(source.fScanlinesToUnMapPtr, {});
    fScanlinesToUnMapRow = std::exchange(source.fScanlinesToUnMapRow, {});
    fBitAlignment = source.fBitAlignment;
    source.ResetAfterSwitch();
}

void TZmBitmap::ResetAfterSwitch() {
    fWidth = 0;
    fHeight = 0;
    fPixelFormat = zmnull;
    fBitCount = 0;
    fChannelCount = 0;
    fRowLen = 0;
    fFull = false;
    fMemory = nullptr;
    fRealMemory = nullptr;
    fRealMemorySize = 0;
    fEncapsulatedFromTBitmap = false;
    fEncapsulatedFromMemory = false;
    fBitmap = nullptr;
    fFragmentsCount = 0;
    fRowsPerFragment = 0;
    fOrigin = zmboBOTTOMLEFT;
    fWorkingMap = nullptr;
    fFullReallocate = true;
}

void TZmBitmap::SwitchTo(TZmBitmap* target) {
    if (target == nullptr || target == this) {
        return;
    }
    target->FreeImage(/*free_alpha=*/true);
    DropCanvases();
    target->MovePixelsFrom(*this);
    target->fCanvasFont = fCanvasFont;
    // A plane never gets a plane; whether an object is one is its owner's affair.
    target->fAlphaChannel = target->fIsAlpha ? nullptr : std::move(fAlphaChannel);
    fAlphaChannel.reset();
    target->fDefaultDitherMethod = fDefaultDitherMethod;
    target->fMemoryAllocator = fMemoryAllocator;
    target->fOnRenderVirtualPixel = fOnRenderVirtualPixel;
    target->fVirtualBitmapProvider = fVirtualBitmapProvider;
    target->fVirtualBitmapRowBuffer = std::exchange(fVirtualBitmapRowBuffer, {});
    target->fIsVirtual = fIsVirtual;
    target->fOnChanged = fOnChanged;
    target->fOnProgress = fOnProgress;
    target->fModified = fModified;
    fIsVirtual = fOnRenderVirtualPixel != nullptr || fVirtualBitmapProvider != nullptr;
}

void TZmBitmap::SaveState() {
    auto saved = std::make_unique<TZmBitmap>();
    saved->fMinFileSize = fMinFileSize;
    saved->CopySettingsFrom(*this);
    const TZmBitmapOrigin origin = fOrigin;
    SwitchTo(saved.get());
    fOrigin = origin;
    AssignEx(saved.get(), /*with_params=*/false);
    if (IsEmpty() && !saved->IsEmpty()) {
        saved->SwitchTo(this);  // no room for the copy
        return;
    }
    fSavedBitmaps.push_back(std::move(saved));
}

void TZmBitmap::RestoreState() {
    if (fSavedBitmaps.empty()) {
        return;
    }
    const std::unique_ptr<TZmBitmap> saved = std::move(fSavedBitmaps.back());
    fSavedBitmaps.pop_back();
    saved->SwitchTo(this);
}

// Notification.

void TZmBitmap::Changed() {
    if (fOnChanged) {
        fOnChanged(this);
    }
}

}  // namespace zm
