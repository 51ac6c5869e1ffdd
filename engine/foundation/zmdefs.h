#pragma once

#include <cstddef>
#include <cstdint>
#include <stdexcept>
#include <string>

/// Types, enumerations and exceptions that every room of the engine shares.
namespace zm {

/// Platform colour value: 0x00BBGGRR, low byte red. A set high byte names a system colour.
using TColor = std::int32_t;

/// Pixel of `zm24RGB` and entry of a palette; byte order in memory blue, green, red.
struct TRGB {
    std::uint8_t b = 0;
    std::uint8_t g = 0;
    std::uint8_t r = 0;
    friend bool operator==(const TRGB&, const TRGB&) = default;
};
static_assert(sizeof(TRGB) == 3);

/// Pixel of `zm32RGB`; byte order in memory blue, green, red, alpha.
struct TRGBA {
    std::uint8_t b = 0;
    std::uint8_t g = 0;
    std::uint8_t r = 0;
    std::uint8_t a = 0;
    friend bool operator==(const TRGBA&, const TRGBA&) = default;
};
static_assert(sizeof(TRGBA) == 4);

/// Pixel of `zm48RGB`: three native 16-bit words, red first.
struct TRGB48 {
    std::uint16_t r = 0;
    std::uint16_t g = 0;
    std::uint16_t b = 0;
    friend bool operator==(const TRGB48&, const TRGB48&) = default;
};
static_assert(sizeof(TRGB48) == 6);

/// Pixel of `zmCMYK`; amounts stored inverted, 255 meaning no ink.
struct TCMYK {
    std::uint8_t c = 0;
    std::uint8_t m = 0;
    std::uint8_t y = 0;
    std::uint8_t k = 0;
    friend bool operator==(const TCMYK&, const TCMYK&) = default;
};
static_assert(sizeof(TCMYK) == 4);

/// Pixel of `zmCIELab`: L as 0 to 255 for 0 to 100, a and b signed.
struct TCIELab {
    std::uint8_t l = 0;
    std::int8_t a = 0;
    std::int8_t b = 0;
    friend bool operator==(const TCIELab&, const TCIELab&) = default;
};
static_assert(sizeof(TCIELab) == 3);

struct TPoint {
    std::int32_t x = 0;
    std::int32_t y = 0;
};

/// Rectangle; right and bottom are exclusive unless a routine says otherwise.
struct TRect {
    std::int32_t left = 0;
    std::int32_t top = 0;
    std::int32_t right = 0;
    std::int32_t bottom = 0;
};

/// Pixel formats; the ordinal is persisted, so the order is fixed.
enum TZmPixelFormat : std::uint8_t {
    zmnull,    ///< no image
    zm1g,      ///< black and white, most significant bit leftmost
    zm8p,      ///< index into the palette
    zm8g,      ///< grey
    zm16g,     ///< grey, unsigned 16 bits
    zm24RGB,   ///< TRGB
    zm32f,     ///< grey, 32-bit float, 0 to 1
    zmCMYK,    ///< TCMYK
    zm48RGB,   ///< TRGB48
    zmCIELab,  ///< TCIELab
    zm32RGB,   ///< TRGBA
};
inline constexpr int kPixelFormatCount = 11;

/// Where the pixels of a bitmap lie.
enum TZmLocation : std::uint8_t { zmMemory, zmFile, zmTBitmap };

/// Which heap a memory bitmap takes its block from.
enum TZmMemoryAllocator : std::uint8_t { zmmaVCL, zmmaSystem, zmmaAuto };

/// Order of the rows in a memory block.
enum TZmBitmapOrigin : std::uint8_t { zmboBOTTOMLEFT, zmboTOPLEFT };

/// How a file-backed row is mapped; a set of the two bits.
enum TZmDataAccess : std::uint8_t { zmdNone = 0, zmdRead = 1, zmdWrite = 2, zmdReadWrite = 3 };

/// How colours become 1-bit pixels.
enum TZmDitherMethod : std::uint8_t { zmOrdered, zmThreshold, zmDithering };

/// Resampling filters; the ordinal is part of stored settings.
enum TResampleFilter : std::uint8_t {
    rfNone,
    rfTriangle,
    rfHermite,
    rfBell,
    rfBSpline,
    rfLanczos3,
    rfMitchell,
    rfNearest,
    rfLinear,
    rfFastLinear,
    rfBilinear,
    rfBicubic,
    rfProjectBW,
    rfProjectWB,
    rfWICNearestNeighbor,
    rfWICLinear,
    rfWICCubic,
    rfWICFant,
};
inline constexpr int kResampleFilterCount = 18;

/// Antialiasing of a rotation by other than quarter turns.
enum TZmAntialiasMode : std::uint8_t { zmrNone, zmrFast, zmrBilinear, zmrBicubic };

/// Direction of a flip.
enum TFlipDir : std::uint8_t { fdHorizontal, fdVertical, fdNone };

/// Raised for misuse of the engine (a missing bitmap, an unsupported request). `what()` is the
/// message in UTF-8.
class EZmException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

/// Colour value from channels.
constexpr TColor ColorFromRGB(TRGB rgb) {
    return static_cast<TColor>(rgb.r | (rgb.g << 8) | (rgb.b << 16));
}

/// Channels of a colour value; a system colour's high byte is dropped.
constexpr TRGB RGBFromColor(TColor color) {
    const auto value = static_cast<std::uint32_t>(color);
    return TRGB{static_cast<std::uint8_t>(value >> 16), static_cast<std::uint8_t>(value >> 8),
                static_cast<std::uint8_t>(value)};
}

}  // namespace zm
