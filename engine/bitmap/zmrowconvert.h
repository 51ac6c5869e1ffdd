#pragma once

#include <cstdint>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// Conversion of one row of pixels between formats: one table of functions of one signature.
/// Codecs deliver rows and call it too, except where a format states its own arithmetic.
namespace zm {

/// A colour transform from inks to RGB, made by the colour management.
class TZmCMYKTransform {
public:
    virtual ~TZmCMYKTransform() = default;
    /// `inks` are four words a pixel: cyan, magenta, yellow, black, 65535 full ink. `colors`
    /// receives three words a pixel: red, green, blue. Called from several threads at once.
    virtual void Transform(const std::uint16_t* inks, std::uint16_t* colors,
                           std::int32_t count) const = 0;
};

/// Installs the transform that CMYK pixels take to RGB while `fUseCMYKProfile` is set; nil goes
/// back to the plain formulas. Borrowed. For set-up, before threads convert.
void SetCMYKTransform(const TZmCMYKTransform* transform);

/// What a row conversion may need beside the pixels.
struct TZmRowContext {
    const TRGB* palette = nullptr;  ///< 256 entries, for a zm8p source
    std::int32_t red_coef = 21;     ///< grey weights in hundredths
    std::int32_t green_coef = 71;
    std::int32_t blue_coef = 8;
    const TZmCMYKTransform* cmyk_transform = nullptr;  ///< nil: plain formulas
};

/// Converts `width` pixels; `source` and `dest` do not overlap. No byte behind the last pixel of
/// `dest` changes, but for the unused bits of its last byte in zm1g, which become 0.
using TZmRowFunction = void (*)(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                                const TZmRowContext& context);

/// The direct row function of a pair, or nil when there is none (equal formats, routes through
/// zm24RGB, 1-bit output, quantising). The fastest for the processor at hand; for rows, not for
/// single pixels.
TZmRowFunction FindRowFunction(TZmPixelFormat from, TZmPixelFormat to);

/// The same without regard to speed: the stated arithmetic, whose bytes every other gives too.
TZmRowFunction FindPlainRowFunction(TZmPixelFormat from, TZmPixelFormat to);

/// Grey weights and CMYK transform from the global settings, palette as given.
TZmRowContext MakeRowContext(const TRGB* palette);

/// (R * red + G * green + B * blue) / 100 with 64-bit sums and integer division, low 8 bits.
std::uint8_t GrayByCoef(TRGB rgb, const TZmRowContext& context);

/// One pixel of a row as RGB, for any format but zmnull.
TRGB RowPixelToRGB(const std::uint8_t* row, std::int32_t x, TZmPixelFormat format,
                   const TRGB* palette);

}  // namespace zm
