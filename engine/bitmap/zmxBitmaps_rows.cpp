/// Addresses of rows in every place, and the rows of virtual bitmaps.

#include <algorithm>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmassert.h"

namespace zm {

// Pixels in memory, one block or fragments; `row` counts as stored.
std::uint8_t* TZmBitmap::RowInMemory(std::int32_t row) const {
    if (fFragmentsCount > 0) {
        return fFragments[static_cast<std::size_t>(row / fRowsPerFragment)] +
               (row % fRowsPerFragment) * fRowLen;
    }
    return fMemory == nullptr ? nullptr : fMemory + (fHeight - row - 1) * fRowLen;
}

std::uint8_t* TZmBitmap::MapFileRow(std::int32_t row) {
    void* const address = fmemmap->Map(row * fRowLen, fRowLen, fAccess);
    if (address == nullptr && fmemmap->IsAllocated()) {
        // Row loops write through the address at once: better an exception than a fault.
        throw EZmException("A row of an image on disk cannot be mapped");
    }
    return static_cast<std::uint8_t*>(address);
}

std::uint8_t* TZmBitmap::GetScanLine(std::int32_t row) {
    if (fIsVirtual) {
        return GetVirtualRow(row);
    }
    UpdateFromTBitmap();
    ZM_ASSERT(row >= 0 && row < fHeight);
    const std::int32_t stored_row = fOrigin == zmboTOPLEFT ? fHeight - row - 1 : row;
    if (fLocation == zmMemory) {
        return RowInMemory(stored_row);
    }
    if (fLocation == zmFile) {
        if (fWorkingMap != nullptr) {
            fmemmap->UnMap(fWorkingMap);
        }
        fWorkingMap = nullptr;
        return fWorkingMap = MapFileRow(stored_row);
    }
    const auto index = static_cast<std::size_t>(stored_row);
    return index < fBitmapScanlines.size() ? fBitmapScanlines[index] : nullptr;
}

std::uint8_t* TZmBitmap::GetRow(std::int32_t row) {
    if (fIsVirtual || fLocation != zmFile) {
        return GetScanLine(row);
    }
    ZM_ASSERT(row >= 0 && row < fHeight);
    if (fWorkingMap != nullptr) {
        fmemmap->UnMap(fWorkingMap);
        fWorkingMap = nullptr;
    }
    std::uint8_t* const address = MapFileRow(fOrigin == zmboTOPLEFT ? fHeight - row - 1 : row);
    fScanlinesToUnMapPtr.push_back(address);
    fScanlinesToUnMapRow.push_back(row);
    return address;
}

/// Rows are freed soon after they were got, or in the order in which they were got: the search
/// runs from both ends of the list at once.
void TZmBitmap::FreeRow(std::int32_t row) {
    const std::size_t count = fScanlinesToUnMapRow.size();
    for (std::size_t i = 0; i < (count + 1) / 2; ++i) {
        const std::size_t last = count - 1 - i;
        const bool is_last = fScanlinesToUnMapRow[last] == row;
        if (!is_last && fScanlinesToUnMapRow[i] != row) {
            continue;
        }
        const auto found = static_cast<std::ptrdiff_t>(is_last ? last : i);
        fmemmap->UnMap(fScanlinesToUnMapPtr[is_last ? last : i]);
        fScanlinesToUnMapPtr.erase(fScanlinesToUnMapPtr.begin() + found);
        fScanlinesToUnMapRow.erase(fScanlinesToUnMapRow.begin() + found);
        return;
    }
}

void TZmBitmap::UnMapRows() {
    fWorkingMap = nullptr;
    fScanlinesToUnMapPtr.clear();
    fScanlinesToUnMapRow.clear();
    fmemmap->UnMapAll();
}

std::uint8_t* TZmBitmap::GetSegment(std::int32_t row, std::int32_t col, std::int32_t width) {
    if (fIsVirtual) {
        return RenderVirtualSegment(row, col, width);
    }
    std::uint8_t* const address = GetScanLine(row);
    return address == nullptr ? nullptr : address + std::int64_t{col} * fBitCount / 8;
}

// Virtual bitmaps.

std::uint8_t* TZmBitmap::GetVirtualRow(std::int32_t row) {
    return RenderVirtualSegment(row, 0, fWidth);
}

std::uint8_t* TZmBitmap::RenderVirtualSegment(std::int32_t row, std::int32_t start,
                                              std::int32_t width) {
    if (fVirtualBitmapProvider != nullptr) {
        return fVirtualBitmapProvider->GetRow(this, row, start, width);
    }
    if (!fOnRenderVirtualPixel || fRowLen == 0) {
        return nullptr;
    }
    const auto row_bytes = static_cast<std::size_t>(fRowLen);
    if (fVirtualBitmapRowBuffer.size() != row_bytes) {
        fVirtualBitmapRowBuffer.resize(row_bytes);
    }
    std::uint8_t* pixel = fVirtualBitmapRowBuffer.data();
    const std::int32_t pixel_bytes = fBitCount / 8;
    for (std::int32_t i = 0; i < std::min(width, fWidth); ++i, pixel += pixel_bytes) {
        fOnRenderVirtualPixel(this, start + i, row, pixel);
    }
    return fVirtualBitmapRowBuffer.data();
}

void TZmBitmap::SetVirtualProvider(TZmVirtualBitmapProvider* provider) {
    fVirtualBitmapProvider = provider;
    SetVirtual(provider != nullptr || fOnRenderVirtualPixel != nullptr);
}

void TZmBitmap::SetOnRenderVirtualPixel(TZmRenderVirtualPixelEvent event) {
    fOnRenderVirtualPixel = std::move(event);
    SetVirtual(fVirtualBitmapProvider != nullptr || fOnRenderVirtualPixel != nullptr);
}

/// A bitmap that becomes virtual keeps its size and lets its pixels go; one that stops being
/// virtual is empty.
void TZmBitmap::SetVirtual(bool is_virtual) {
    if (is_virtual == fIsVirtual) {
        return;
    }
    const std::int32_t width = is_virtual ? GetWidth() : 0;
    const std::int32_t height = is_virtual ? fHeight : 0;
    FreePixels();
    fIsVirtual = is_virtual;
    fWidth = width;
    fHeight = height;
    DeriveFields();
}

}  // namespace zm
