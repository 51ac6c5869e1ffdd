/// Single pixels, typed and as RGB.

#include <array>
#include <cstring>

#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmxBitmaps.h"

namespace zm {
namespace {

template <typename T>
T LoadPixel(const std::uint8_t* row, std::int32_t x) {
    T value;
    std::memcpy(&value, row + static_cast<std::size_t>(x) * sizeof(T), sizeof(T));
    return value;
}

template <typename T>
void StorePixel(std::uint8_t* row, std::int32_t x, T value) {
    std::memcpy(row + static_cast<std::size_t>(x) * sizeof(T), &value, sizeof(T));
}

}  // namespace

bool TZmBitmap::GetPixels_zm1g(std::int32_t x, std::int32_t y) {
    return (GetScanLine(y)[x >> 3] >> (7 - (x & 7)) & 1) != 0;
}

void TZmBitmap::SetPixels_zm1g(std::int32_t x, std::int32_t y, bool value) {
    std::uint8_t& byte = GetScanLine(y)[x >> 3];
    const int bit = 0x80 >> (x & 7);
    byte = static_cast<std::uint8_t>(value ? byte | bit : byte & ~bit);
}

std::uint8_t TZmBitmap::GetPixels_zm8(std::int32_t x, std::int32_t y) {
    return GetScanLine(y)[x];
}

void TZmBitmap::SetPixels_zm8(std::int32_t x, std::int32_t y, std::uint8_t value) {
    GetScanLine(y)[x] = value;
}

std::uint16_t TZmBitmap::GetPixels_zm16g(std::int32_t x, std::int32_t y) {
    return LoadPixel<std::uint16_t>(GetScanLine(y), x);
}

void TZmBitmap::SetPixels_zm16g(std::int32_t x, std::int32_t y, std::uint16_t value) {
    StorePixel(GetScanLine(y), x, value);
}

TRGB TZmBitmap::GetPixels_zm24RGB(std::int32_t x, std::int32_t y) {
    return LoadPixel<TRGB>(GetScanLine(y), x);
}

void TZmBitmap::SetPixels_zm24RGB(std::int32_t x, std::int32_t y, TRGB value) {
    StorePixel(GetScanLine(y), x, value);
}

TRGB* TZmBitmap::GetPPixels_zm24RGB(std::int32_t x, std::int32_t y) {
    return reinterpret_cast<TRGB*>(GetScanLine(y)) + x;
}

TRGBA TZmBitmap::GetPixels_zm32RGB(std::int32_t x, std::int32_t y) {
    return LoadPixel<TRGBA>(GetScanLine(y), x);
}

void TZmBitmap::SetPixels_zm32RGB(std::int32_t x, std::int32_t y, TRGBA value) {
    StorePixel(GetScanLine(y), x, value);
}

TRGBA* TZmBitmap::GetPPixels_zm32RGB(std::int32_t x, std::int32_t y) {
    return reinterpret_cast<TRGBA*>(GetScanLine(y)) + x;
}

float TZmBitmap::GetPixels_zm32f(std::int32_t x, std::int32_t y) {
    return LoadPixel<float>(GetScanLine(y), x);
}

void TZmBitmap::SetPixels_zm32f(std::int32_t x, std::int32_t y, float value) {
    StorePixel(GetScanLine(y), x, value);
}

TCMYK TZmBitmap::GetPixels_zmCMYK(std::int32_t x, std::int32_t y) {
    return LoadPixel<TCMYK>(GetScanLine(y), x);
}

void TZmBitmap::SetPixels_zmCMYK(std::int32_t x, std::int32_t y, TCMYK value) {
    StorePixel(GetScanLine(y), x, value);
}

TCIELab TZmBitmap::GetPixels_zmCIELab(std::int32_t x, std::int32_t y) {
    return LoadPixel<TCIELab>(GetScanLine(y), x);
}

void TZmBitmap::SetPixels_zmCIELab(std::int32_t x, std::int32_t y, TCIELab value) {
    StorePixel(GetScanLine(y), x, value);
}

TRGB48 TZmBitmap::GetPixels_zm48RGB(std::int32_t x, std::int32_t y) {
    return LoadPixel<TRGB48>(GetScanLine(y), x);
}

void TZmBitmap::SetPixels_zm48RGB(std::int32_t x, std::int32_t y, TRGB48 value) {
    StorePixel(GetScanLine(y), x, value);
}

TRGB48* TZmBitmap::GetPPixels_zm48RGB(std::int32_t x, std::int32_t y) {
    return reinterpret_cast<TRGB48*>(GetScanLine(y)) + x;
}

// Any format.

TRGB TZmBitmap::GetPixels(std::int32_t x, std::int32_t y) {
    const std::uint8_t* const row = GetScanLine(y);
    if (row == nullptr) {
        return TRGB{};
    }
    return fPixelFormat == zm8p ? GetPalette(row[x]) : RowPixelToRGB(row, x, fPixelFormat, nullptr);
}

TZmRowLayout TZmBitmap::GetRowLayout() {
    TZmRowLayout layout;
    layout.format = fPixelFormat;
    layout.palette_used = fPaletteUsed;
    if (fPixelFormat == zm8p) {
        fRGBPalette.resize(256);
        layout.palette = fRGBPalette.data();
    }
    layout.context = MakeRowContext(layout.palette);
    return layout;
}

void TZmBitmap::SetPixels(std::int32_t x, std::int32_t y, TRGB value) {
    std::uint8_t* const row = GetScanLine(y);
    if (row != nullptr) {
        StoreRGBPixels(&value, row, x, 1, GetRowLayout());
    }
}

// Alpha. The plane may have another size than the image.

std::uint8_t TZmBitmap::GetAlpha(std::int32_t x, std::int32_t y) {
    TZmBitmap* const plane = fAlphaChannel.get();
    if (plane == nullptr || plane->fPixelFormat != zm8g || x >= plane->fWidth ||
        y >= plane->fHeight) {
        return 255;
    }
    return plane->GetPixels_zm8(x, y);
}

void TZmBitmap::SetAlpha(std::int32_t x, std::int32_t y, std::uint8_t value) {
    TZmBitmap* const plane = GetAlphaChannel();
    if (plane == nullptr || plane->fPixelFormat != zm8g || x >= plane->fWidth ||
        y >= plane->fHeight) {
        return;
    }
    plane->SetPixels_zm8(x, y, value);
    plane->fFull = plane->fFull && value == 255;
}

}  // namespace zm
