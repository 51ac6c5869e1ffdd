/// CMYK and CIELab rows to and from RGB.
///
/// CMYK bytes hold the amounts inverted, 255 meaning no ink. Without a colour transform the
/// channels are products: R = K * C / 255 in integers; the way back takes K = max(R, G, B) and
/// rounds the quotients up, so that the pair restores every colour exactly.
///
/// CIELab is relative to D65: CIE 15 (colorimetry) with the cube root's linear part below
/// 0.008856, and the sRGB matrices and transfer curve of IEC 61966-2-1.

#include <algorithm>
#include <array>
#include <cmath>

#include "engine/bitmap/zmrowconvert_p.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr double kWhiteX = 0.95047;
constexpr double kWhiteZ = 1.08883;
constexpr double kLabLinearLimit = 0.008856;
constexpr double kLabSlope = 7.787;
constexpr double kLabOffset = 16.0 / 116.0;
constexpr std::int32_t kTransformChunk = 256;  // pixels handed to a transform at a time

TRGB PlainRGBFromCMYK(const std::uint8_t* pixel) {
    const int k = pixel[3];
    return TRGB{static_cast<std::uint8_t>(k * pixel[2] / 255),
                static_cast<std::uint8_t>(k * pixel[1] / 255),
                static_cast<std::uint8_t>(k * pixel[0] / 255)};
}

void StorePixel24(std::uint8_t* dest, TRGB rgb) {
    dest[0] = rgb.b;
    dest[1] = rgb.g;
    dest[2] = rgb.r;
}

void StorePixel32(std::uint8_t* dest, TRGB rgb) {
    StorePixel24(dest, rgb);
    dest[3] = 255;
}

template <std::int32_t kDestBytes>
void StorePixel(std::uint8_t* dest, TRGB rgb) {
    if constexpr (kDestBytes == 4) {
        StorePixel32(dest, rgb);
    } else {
        StorePixel24(dest, rgb);
    }
}

/// A run of at most kTransformChunk pixels through the colour transform.
template <std::int32_t kDestBytes>
void TransformChunk(const std::uint8_t* source, std::uint8_t* dest, std::int32_t count,
                    const TZmCMYKTransform& transform) {
    std::array<std::uint16_t, kTransformChunk * 4> inks{};
    std::array<std::uint16_t, kTransformChunk * 3> colors{};
    for (std::int32_t i = 0; i < count * 4; ++i) {
        inks[static_cast<std::size_t>(i)] = static_cast<std::uint16_t>((255 - source[i]) * 257);
    }
    transform.Transform(inks.data(), colors.data(), count);
    const std::uint16_t* color = colors.data();
    for (std::int32_t x = 0; x < count; ++x, color += 3, dest += kDestBytes) {
        StorePixel<kDestBytes>(dest, TRGB{static_cast<std::uint8_t>(color[2] >> 8),
                                          static_cast<std::uint8_t>(color[1] >> 8),
                                          static_cast<std::uint8_t>(color[0] >> 8)});
    }
}

template <std::int32_t kDestBytes>
void ConvertCMYKRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                    const TZmRowContext& context) {
    if (context.cmyk_transform == nullptr) {
        for (std::int32_t x = 0; x < width; ++x, source += 4, dest += kDestBytes) {
            StorePixel<kDestBytes>(dest, PlainRGBFromCMYK(source));
        }
        return;
    }
    while (width > 0) {
        const std::int32_t count = std::min(width, kTransformChunk);
        TransformChunk<kDestBytes>(source, dest, count, *context.cmyk_transform);
        source += count * 4;
        dest += count * kDestBytes;
        width -= count;
    }
}

double CubeOrLinear(double t) {
    const double cube = t * t * t;
    return cube > kLabLinearLimit ? cube : (t - kLabOffset) / kLabSlope;
}

double RootOrLinear(double t) {
    return t > kLabLinearLimit ? std::pow(t, 1.0 / 3.0) : kLabSlope * t + kLabOffset;
}

std::uint8_t EncodeChannel(double linear) {
    const double encoded =
        linear > 0.0031308 ? 1.055 * std::pow(linear, 1.0 / 2.4) - 0.055 : 12.92 * linear;
    return Clamp8(RoundHalfEven(encoded * 255.0));
}

TRGB RGBFromCIELab(TCIELab lab) {
    const double fy = (lab.l * (100.0 / 255.0) + 16.0) / 116.0;
    const double fx = lab.a / 500.0 + fy;
    const double fz = fy - lab.b / 200.0;
    const double x = kWhiteX * CubeOrLinear(fx);
    const double y = CubeOrLinear(fy);
    const double z = kWhiteZ * CubeOrLinear(fz);
    return TRGB{EncodeChannel(0.0557 * x - 0.204 * y + 1.057 * z),
                EncodeChannel(-0.9689 * x + 1.8758 * y + 0.0415 * z),
                EncodeChannel(3.2406 * x - 1.5372 * y - 0.4986 * z)};
}

std::array<double, 256> MakeLinearTable() {
    std::array<double, 256> table{};
    for (std::size_t i = 0; i < table.size(); ++i) {
        const double channel = static_cast<double>(i) / 255.0;
        table[i] = channel > 0.04045 ? std::pow((channel + 0.055) / 1.055, 2.4) : channel / 12.92;
    }
    return table;
}

std::int8_t ToSignedByte(double value) {
    return static_cast<std::int8_t>(std::clamp(TruncToInt(value), -128, 127));
}

TCIELab CIELabFromRGB(TRGB rgb, const std::array<double, 256>& linear) {
    const double r = linear[rgb.r];
    const double g = linear[rgb.g];
    const double b = linear[rgb.b];
    const double fx = RootOrLinear((0.4124 * r + 0.3576 * g + 0.1805 * b) / kWhiteX);
    const double fy = RootOrLinear(0.2126 * r + 0.7152 * g + 0.0722 * b);
    const double fz = RootOrLinear((0.0193 * r + 0.1192 * g + 0.9505 * b) / kWhiteZ);
    const double l = (116.0 * fy - 16.0) * 255.0 / 100.0;
    return TCIELab{Clamp8(TruncToInt(l)), ToSignedByte(500.0 * (fx - fy)),
                   ToSignedByte(200.0 * (fy - fz))};
}

template <std::int32_t kDestBytes>
void ConvertCIELabRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width) {
    for (std::int32_t x = 0; x < width; ++x, source += 3, dest += kDestBytes) {
        const TCIELab lab{source[0], static_cast<std::int8_t>(source[1]),
                          static_cast<std::int8_t>(source[2])};
        StorePixel<kDestBytes>(dest, RGBFromCIELab(lab));
    }
}

}  // namespace

void RowCMYKTo24RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                    const TZmRowContext& context) {
    ConvertCMYKRow<3>(source, dest, width, context);
}

void RowCMYKTo32RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                    const TZmRowContext& context) {
    ConvertCMYKRow<4>(source, dest, width, context);
}

void Row24RGBToCMYK(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                    const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x, source += 3, dest += 4) {
        const int k = std::max({source[0], source[1], source[2]});
        // Black has no hue to keep: no coloured ink.
        const int divisor = std::max(k, 1);
        const int base = k == 0 ? 255 : divisor - 1;
        dest[0] = static_cast<std::uint8_t>((255 * source[2] + base) / divisor);
        dest[1] = static_cast<std::uint8_t>((255 * source[1] + base) / divisor);
        dest[2] = static_cast<std::uint8_t>((255 * source[0] + base) / divisor);
        dest[3] = static_cast<std::uint8_t>(k);
    }
}

void RowCIELabTo24RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                      const TZmRowContext&) {
    ConvertCIELabRow<3>(source, dest, width);
}

void RowCIELabTo32RGB(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                      const TZmRowContext&) {
    ConvertCIELabRow<4>(source, dest, width);
}

void Row24RGBToCIELab(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                      const TZmRowContext&) {
    static const std::array<double, 256> linear = MakeLinearTable();
    for (std::int32_t x = 0; x < width; ++x, source += 3, dest += 3) {
        const TCIELab lab = CIELabFromRGB(TRGB{source[0], source[1], source[2]}, linear);
        dest[0] = lab.l;
        dest[1] = static_cast<std::uint8_t>(lab.a);
        dest[2] = static_cast<std::uint8_t>(lab.b);
    }
}

}  // namespace zm
