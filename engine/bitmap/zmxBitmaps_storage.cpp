/// Where the pixels lie: choice of the place, allocation, encapsulation and freeing.

#include <algorithm>
#include <limits>

#include "engine/bitmap/zmbitmapmemory_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/platform/memory.h"

namespace zm {
namespace {

constexpr std::int64_t kBlockSlackBytes = 128;
constexpr std::int64_t kLargestImageBytes =
    std::numeric_limits<std::int64_t>::max() - kBlockSlackBytes;
constexpr std::uintptr_t kBlockAlignment = 64;
constexpr std::int32_t kFirstFragmentCount = 4;
constexpr std::int64_t kSmallestFragmentBytes = 10485760;
constexpr std::int32_t kTBitmapAlignmentBits = 32;
constexpr std::size_t kPaletteEntries = 256;

/// Layout of a platform bitmap for a pixel format; raises for formats that none holds.
TBitmapPixelFormat TBitmapFormatFor(TZmPixelFormat format) {
    switch (format) {
        case zm1g: return pf1bit;
        case zm8p:
        case zm8g:
        case zm16g: return pf8bit;
        case zm24RGB: return pf24bit;
        case zm32RGB: return pf32bit;
        case zm32f:
            throw EZmException("zm32f pixel format not allowed when ZmBitmap.Location=zmTBitmap");
        case zmCMYK:
            throw EZmException("zmCMYK pixel format not allowed when ZmBitmap.Location=zmTBitmap");
        case zm48RGB:
            throw EZmException("zmRGB48 pixel format not allowed when ZmBitmap.Location=zmTBitmap");
        case zmCIELab:
            throw EZmException(
                "zmCIELab pixel format not allowed when ZmBitmap.Location=zmTBitmap");
        default: return pfNone;
    }
}

/// Pixel format that a platform bitmap's layout stands for; `other` for a layout without one.
TZmPixelFormat FormatOfTBitmap(TBitmapPixelFormat format, TZmPixelFormat other) {
    switch (format) {
        case pf1bit: return zm1g;
        case pf8bit: return zm8p;
        case pf24bit: return zm24RGB;
        case pf32bit: return zm32RGB;
        default: return other;
    }
}

std::uint8_t* AlignBlock(void* block) {
    const auto address = reinterpret_cast<std::uintptr_t>(block);
    const std::uintptr_t rest = address % kBlockAlignment;
    return static_cast<std::uint8_t*>(block) + (rest == 0 ? 0 : kBlockAlignment - rest);
}

}  // namespace

// Derived fields.

/// Bit count, channels and row length from format, width and alignment; all 0 and False when they
/// make no row.
bool TZmBitmap::DeriveFields() {
    const TZmPixelFormatRow& info = PixelFormatInfo(fPixelFormat);
    const std::int32_t alignment = fLocation == zmTBitmap ? kTBitmapAlignmentBits : fBitAlignment;
    const auto row_len = CalcRowLen(fWidth, info.bit_count, alignment);
    fBitCount = row_len ? info.bit_count : 0;
    fChannelCount = row_len ? info.channel_count : 0;
    fRowLen = row_len.value_or(0);
    return row_len.has_value();
}

void TZmBitmap::SetBitAlignment(std::int32_t bits) {
    const bool is_power_of_two = bits > 0 && (bits & (bits - 1)) == 0;
    if (bits != fBitAlignment && is_power_of_two && bits >= 8 && bits <= 1024) {
        fBitAlignment = bits;
        fFullReallocate = true;
    }
}

// Allocation.

bool TZmBitmap::Allocate(std::int32_t width, std::int32_t height, TZmPixelFormat format) {
    if (!fFullReallocate && !IsEmpty() && width == fWidth && height == fHeight &&
        format == fPixelFormat) {
        Changed();
        return true;
    }
    if (fEncapsulatedFromTBitmap) {
        fAlphaChannel.reset();
    } else {
        FreeImage(/*free_alpha=*/true);
    }
    const bool is_allocated = AllocateNewStorage(width, height, format);
    fFullReallocate = false;
    Changed();
    return is_allocated;
}

bool TZmBitmap::Allocate(std::int32_t width, std::int32_t height, TColor fill_color,
                         std::int32_t alpha) {
    if (!Allocate(width, height, zm24RGB)) {
        return false;
    }
    Fill(static_cast<double>(fill_color));
    if (alpha < 255) {
        AlphaFill(alpha);
    }
    return true;
}

/// Stores size and format and makes room; without room the size is 0.
bool TZmBitmap::AllocateNewStorage(std::int32_t width, std::int32_t height, TZmPixelFormat format) {
    DropCanvases();
    fWidth = std::max(width, 0);
    fHeight = std::max(height, 0);
    fPixelFormat = IsImageFormat(format) ? format : zmnull;
    const bool is_allocated = AllocateStorage();
    if (!is_allocated) {
        fWidth = 0;
        fHeight = 0;
        fRowLen = 0;
    }
    return is_allocated;
}

bool TZmBitmap::AllocateStorage() {
    if (fWidth < 1 || fHeight < 1 || fPixelFormat == zmnull || !DeriveFields()) {
        return false;
    }
    if (fPixelFormat == zm8p) {
        fRGBPalette.resize(kPaletteEntries);
    }
    if (!fIsVirtual) {
        const auto size_bytes = CheckedMul(fRowLen, fHeight);
        // Larger than the address space is no obstacle: such an image goes to disk.
        if (!size_bytes || *size_bytes > kLargestImageBytes || !ChooseAndAllocate(*size_bytes)) {
            return false;
        }
    }
    fFull = false;
    return true;
}

bool TZmBitmap::ChooseAndAllocate(std::int64_t size_bytes) {
    if (fLocation == zmTBitmap) {
        return AllocateInTBitmap(size_bytes);
    }
    fLocation = fMinFileSize >= size_bytes ? zmMemory : zmFile;
    if (fLocation == zmFile && AllocateInFile(size_bytes)) {
        return true;
    }
    fLocation = zmMemory;
    if (AllocateInMemory(size_bytes)) {
        return true;
    }
    if (ZmGlobalSettings().fAutoFragmentBitmap && AllocateFragments()) {
        return true;
    }
    if (!ZmGlobalSettings().fAutoLocateOnDisk) {
        return false;
    }
    fLocation = zmFile;
    return AllocateInFile(size_bytes);
}

bool TZmBitmap::AllocateInFile(std::int64_t size_bytes) {
    return fmemmap->AllocateFile(size_bytes, "IMG", /*use_disk=*/true);
}

bool TZmBitmap::AllocateInMemory(std::int64_t size_bytes) {
    const std::int64_t block_bytes = size_bytes + kBlockSlackBytes;
    fRealMemory = AllocateBitmapBlock(fMemoryAllocator, block_bytes);
    if (fRealMemory == nullptr) {
        return false;
    }
    fRealMemorySize = block_bytes;
    fRealMemoryAllocator = fMemoryAllocator;
    fMemory = AlignBlock(fRealMemory);
    return true;
}

/// The answer to a heap without a single free block that is big enough.
bool TZmBitmap::AllocateFragments() {
    std::int64_t count = kFirstFragmentCount;
    do {
        const std::int64_t rows = (fHeight + count - 1) / count;
        const std::int64_t fragment_bytes = rows * fRowLen;
        if (fragment_bytes < kSmallestFragmentBytes && count > kFirstFragmentCount) {
            return false;
        }
        fRowsPerFragment = static_cast<std::int32_t>(rows);
        while (static_cast<std::int64_t>(fFragments.size()) < count) {
            std::uint8_t* const fragment = AllocateBitmapFragment(fragment_bytes);
            if (fragment == nullptr) {
                break;
            }
            fFragments.push_back(fragment);
        }
        if (static_cast<std::int64_t>(fFragments.size()) == count) {
            fFragmentsCount = static_cast<std::int32_t>(count);
            return true;
        }
        FreeFragments();
        count *= 2;
    } while (fHeight > count);
    return false;
}

bool TZmBitmap::AllocateInTBitmap(std::int64_t size_bytes) {
    const std::int64_t memory = platform::PhysicalMemoryBytes();
    if (memory > 0 && size_bytes > memory) {
        return false;
    }
    TBitmapPixelFormat layout = pfNone;
    try {
        layout = TBitmapFormatFor(fPixelFormat);
    } catch (const EZmException&) {
        fBitCount = 0;  // the size stays as it was stored, but there are no pixels
        fRowLen = 0;
        throw;
    }
    if (fBitmap == nullptr) {
        fOwnedBitmap = std::make_unique<TBitmap>();
        fBitmap = fOwnedBitmap.get();
    }
    if (!fBitmap->SetSize(fWidth, fHeight, layout)) {
        return false;
    }
    if (fPixelFormat == zm16g) {
        fPixelFormat = zm8g;
        DeriveFields();
    }
    if (fPixelFormat == zm8g) {
        for (std::size_t i = 0; i < kPaletteEntries; ++i) {
            const auto value = static_cast<std::uint8_t>(i);
            fBitmap->ColorTable()[i] = TRGB{value, value, value};
        }
    }
    BuildBitmapScanlines();
    UpdateTBitmapPalette();
    return true;
}

void TZmBitmap::BuildBitmapScanlines() {
    fBitmapScanlines.resize(static_cast<std::size_t>(std::max(fHeight, 0)));
    for (std::int32_t y = 0; y < fHeight; ++y) {
        fBitmapScanlines[static_cast<std::size_t>(y)] = fBitmap->GetScanLine(y);
    }
}

void TZmBitmap::UpdateFromTBitmap() {
    if (fLocation != zmTBitmap || fBitmap == nullptr) {
        return;
    }
    const TBitmapPixelFormat layout = fBitmap->GetPixelFormat();
    const bool is_gray = layout == pf8bit && fPixelFormat == zm8g;
    const TZmPixelFormat format = is_gray ? zm8g : FormatOfTBitmap(layout, fPixelFormat);
    const std::uint8_t* const first_row = fBitmap->GetScanLine(0);
    const bool is_same =
        fWidth == fBitmap->GetWidth() && fHeight == fBitmap->GetHeight() && fPixelFormat == format;
    if (is_same && (fBitmapScanlines.empty() || fBitmapScanlines.front() == first_row)) {
        return;
    }
    fWidth = fBitmap->GetWidth();
    fHeight = fBitmap->GetHeight();
    fPixelFormat = format;
    if (format == zm8p) {
        fRGBPalette = fBitmap->ColorTable();
        fRGBPalette.resize(kPaletteEntries);
    }
    DeriveFields();
    BuildBitmapScanlines();
}

// Encapsulation.

void TZmBitmap::EncapsulateTBitmap(TBitmap* bitmap, bool do_free_image) {
    if (do_free_image) {
        FreeImage(/*free_alpha=*/true);
    }
    if (bitmap == nullptr || bitmap == fOwnedBitmap.get()) {
        return;
    }
    const TZmPixelFormat format = FormatOfTBitmap(bitmap->GetPixelFormat(), fPixelFormat);
    if (fEncapsulatedFromTBitmap && fBitmap == bitmap && fWidth == bitmap->GetWidth() &&
        fHeight == bitmap->GetHeight() && fPixelFormat == format) {
        return;
    }
    FreePixels();
    fBitmap = bitmap;
    fLocation = zmTBitmap;
    fEncapsulatedFromTBitmap = true;
    fWidth = bitmap->GetWidth();
    fHeight = bitmap->GetHeight();
    fPixelFormat = format;
    fRGBPalette.clear();
    if (format == zm8p) {
        fRGBPalette = bitmap->ColorTable();
        fRGBPalette.resize(kPaletteEntries);
    }
    DeriveFields();
    BuildBitmapScanlines();
}

void TZmBitmap::EncapsulateMemory(void* memory, std::int32_t width, std::int32_t height,
                                  TZmPixelFormat format, bool do_free_image,
                                  TZmBitmapOrigin origin) {
    if (do_free_image) {
        FreeImage(/*free_alpha=*/true);
    }
    if (memory == nullptr || width < 1 || height < 1 || !IsImageFormat(format)) {
        return;
    }
    FreePixels();
    fLocation = zmMemory;
    fWidth = width;
    fHeight = height;
    fPixelFormat = format;
    fOrigin = origin;
    if (!DeriveFields() || !FitsAddressSpace(fRowLen * height)) {
        FreePixels();
        return;
    }
    fEncapsulatedFromMemory = true;
    fMemory = static_cast<std::uint8_t*>(memory);
    fRealMemory = memory;
    fRGBPalette.resize(format == zm8p ? kPaletteEntries : 0);
}

// Freeing.

void TZmBitmap::FreeImage(bool free_alpha) {
    if (free_alpha) {
        fAlphaChannel.reset();
    }
    fRGBPalette.clear();
    FreePixels();
    fVirtualBitmapRowBuffer = {};
}

void TZmBitmap::Clear() {
    FreeImage(/*free_alpha=*/true);
    fPixelFormat = zmnull;
    Changed();
}

/// Lets go of the pixels in whatever place; size and derived fields become 0.
void TZmBitmap::FreePixels() {
    DropCanvases();
    UnMapRows();
    fmemmap->DeAllocate();
    FreeMemoryBlock();
    FreeFragments();
    fOwnedBitmap.reset();
    fBitmap = nullptr;
    fBitmapScanlines.clear();
    fEncapsulatedFromTBitmap = false;
    fEncapsulatedFromMemory = false;
    fWidth = 0;
    fHeight = 0;
    fBitCount = 0;
    fChannelCount = 0;
    fRowLen = 0;
    fFull = false;
}

/// Canvases draw on pixels that are about to go.
void TZmBitmap::DropCanvases() {
    fZmCanvas.reset();
    fCanvas.reset();
}

void TZmBitmap::FreeMemoryBlock() {
    if (!fEncapsulatedFromMemory) {
        FreeBitmapBlock(fRealMemory, fRealMemoryAllocator, fRealMemorySize);
    }
    fRealMemory = nullptr;
    fRealMemorySize = 0;
    fMemory = nullptr;
}

void TZmBitmap::FreeFragments() {
    const std::int64_t fragment_bytes = fRowsPerFragment * fRowLen;
    for (std::uint8_t* const fragment : fFragments) {
        FreeBitmapFragment(fragment, fragment_bytes);
    }
    fFragments.clear();
    fFragmentsCount = 0;
    fRowsPerFragment = 0;
}

// Moving pixels that are there already.

void TZmBitmap::SetLocation(TZmLocation location) {
    if (location == fLocation) {
        return;
    }
    if (fIsVirtual || IsEmpty()) {
        if (fBitmap != nullptr) {
            FreePixels();
        }
        fLocation = location;
        return;
    }
    if (location == zmTBitmap) {
        TBitmapFormatFor(fPixelFormat);  // raises before anything is changed
    }
    TZmBitmap old;
    old.fMinFileSize = fMinFileSize;
    old.MovePixelsFrom(*this);
    fRGBPalette = old.fRGBPalette;
    fLocation = location;
    if (!AllocateNewStorage(old.fWidth, old.fHeight, old.fPixelFormat)) {
        FreePixels();
        MovePixelsFrom(old);
        return;
    }
    fFullReallocate = false;
    if (fPixelFormat == old.fPixelFormat) {
        CopyPixelsFrom(&old);
    } else {
        ConvertPixelsFrom(old);
    }
    fFull = old.fFull;
}

/// Gives the platform bitmap the size and pixels of `pixels`, whose format it can hold. The
/// object stays the same, so that a borrowed one shows the change to its owner.
bool TZmBitmap::ReplaceTBitmapPixels(TZmBitmap& pixels) {
    fRGBPalette = pixels.fRGBPalette;
    if (!AllocateNewStorage(pixels.GetWidth(), pixels.fHeight, pixels.fPixelFormat)) {
        return false;
    }
    CopyPixelsFrom(&pixels);
    fBitmap->SetModified(true);
    return true;
}

}  // namespace zm
