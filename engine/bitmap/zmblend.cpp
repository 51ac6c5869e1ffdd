/// The blend operations on one pixel. Most treat the three channels alike; HSL, YCbCr and the
/// stereo operations look at whole pixels.
///
/// YCbCr is that of ITU-T T.871; the anaglyph matrix is the published least-squares projection
/// for red and cyan glasses.

#include "engine/bitmap/zmblend.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <numbers>

#include "engine/bitmap/zmblend_p.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

std::uint8_t LowByte(int value) {
    return static_cast<std::uint8_t>(value & 255);
}

// Operations on one channel: a is the source's, b the destination's.

int Screen(int a, int b) {
    return TruncToInt(255.0 - (255 - a) * (255 - b) / 255.0);
}

/// Multiplies where `chooser` is dark, screens where it is light.
int MultiplyOrScreen(int a, int b, int chooser) {
    return chooser >= 128 ? 255 - (((255 - a) * (255 - b)) >> 7) : (a * b) >> 7;
}

int CrossFade(int a, int b) {
    const int product = (a * b) >> 8;
    return (((255 - (((255 - b) * (255 - a)) >> 8) - product) * b) >> 8) + product;
}

/// value * 2^shift / (255 - divisor), limited; 255 where that divides by 0.
int Dodge(int value, int divisor, int shift) {
    return divisor < 255 ? std::min(255, (value << shift) / (255 - divisor)) : 255;
}

/// The rest to 255 of (255 - value) * 2^shift / divisor, at least 0.
int Burn(int value, int divisor, int shift) {
    return divisor != 0 ? std::max(0, 255 - ((255 - value) << shift) / divisor) : 0;
}

int SoftDodge(int a, int b) {
    return a + b >= 256 ? Burn(a, b, 7) : Dodge(b, a, 7);
}

/// value^2 / (255 - divisor), limited.
int Reflect(int value, int divisor) {
    return divisor < 255 ? std::min(255, value * value / (255 - divisor)) : 255;
}

int Freeze(int value, int divisor) {
    const int rest = 255 - value;
    return divisor != 0 ? std::max(0, 255 - rest * rest / divisor) : 0;
}

/// Half a cosine wave from 0 to 128.
std::array<std::uint8_t, 256> MakeCosineTable() {
    std::array<std::uint8_t, 256> table{};
    for (std::size_t i = 0; i < table.size(); ++i) {
        const double angle = static_cast<double>(i) * std::numbers::pi / 255.0;
        table[i] = LowByte(RoundHalfEven(64.0 - 64.0 * std::cos(angle)));
    }
    return table;
}

int Interpolate(int a, int b) {
    static const std::array<std::uint8_t, 256> cosines = MakeCosineTable();
    return std::min(255,
                    cosines[static_cast<std::size_t>(a)] + cosines[static_cast<std::size_t>(b)]);
}

/// Operations 1 to 30 but zmlSoftLight; the low byte of the result counts.
int BlendChannel(int a, int b, std::uint8_t operation) {
    switch (operation) {
        case zmlAdd: return Clamp8(a + b);
        case zmlSub: return std::abs(b - a);
        case zmlDiv: return Clamp8(b / std::max(a, 1));
        case zmlMul: return (a * b) >> 8;
        case zmlOR: return a | b;
        case zmlAND: return a & b;
        case zmlXOR: return a ^ b;
        case zmlMAX: return std::max(a, b);
        case zmlMIN: return std::min(a, b);
        case zmlAverage: return (a + b) >> 1;
        case zmlScreen: return Screen(a, b);
        case zmlNegation: return 255 - std::abs(255 - a - b);
        case zmlExclusion: return ((a + b) & 255) - ((a * b) >> 7);
        case zmlOverlay: return MultiplyOrScreen(a, b, b);
        case zmlHardLight: return MultiplyOrScreen(a, b, a);
        case zmlXFader: return CrossFade(a, b);
        case zmlColorEdge: return Dodge(b, a, 8);
        case zmlColorBurn: return Burn(b, a, 8);
        case zmlInverseColorDodge: return Dodge(a, b, 8);
        case zmlInverseColorBurn: return Burn(a, b, 8);
        case zmlSoftDodge: return SoftDodge(a, b);
        case zmlSoftBurn: return SoftDodge(b, a);
        case zmlReflect: return Reflect(b, a);
        case zmlGlow: return Reflect(a, b);
        case zmlFreeze: return Freeze(b, a);
        case zmlEat: return Freeze(a, b);
        case zmlSubtractive: return Clamp8(a + b - 256);
        case zmlInterpolation: return Interpolate(a, b);
        case zmlStamp: return Clamp8(2 * a + b - 256);
        default: return a;
    }
}

std::uint8_t SoftLightChannel(int source_red, int dest_channel) {
    const double a = source_red / 255.0;
    const double b = dest_channel / 255.0;
    const double result =
        a < 0.5 ? (1 - 2 * a) * (b * b) + 2 * a * b : std::sqrt(b) * (2 * a - 1) + 2 * b * (1 - a);
    return Clamp8(TruncToInt(255 * result));
}

/// SoftLightChannel of all pairs: first index the source's red, second the channel.
using TSoftLightTable = std::array<std::array<std::uint8_t, 256>, 256>;

TSoftLightTable MakeSoftLightTable() {
    TSoftLightTable table{};
    for (std::size_t red = 0; red < table.size(); ++red) {
        for (std::size_t channel = 0; channel < table.size(); ++channel) {
            table[red][channel] =
                SoftLightChannel(static_cast<int>(red), static_cast<int>(channel));
        }
    }
    return table;
}

// Required: the source's red stands for all its channels; stored pictures depend on the look.
TRGB SoftLight(TRGB a, TRGB b) {
    return TRGB{SoftLightChannel(a.r, b.b), SoftLightChannel(a.r, b.g), SoftLightChannel(a.r, b.r)};
}

// HSL, all parts 0 to 1.

struct THsl {
    double hue = 0;
    double saturation = 0;
    double lightness = 0;
};

double FindHue(double r, double g, double b, double high, double low) {
    const double range = high - low;
    double hue = 0;
    if (r == high) {
        hue = (g - b) / range;
    } else if (g == high) {
        hue = 2 + (b - r) / range;
    } else {
        hue = 4 + (r - g) / range;
    }
    hue /= 6;
    return hue < 0 ? hue + 1 : hue;
}

THsl HslFromRGB(TRGB rgb) {
    const double r = rgb.r / 255.0;
    const double g = rgb.g / 255.0;
    const double b = rgb.b / 255.0;
    const double high = std::max({r, g, b});
    const double low = std::min({r, g, b});
    THsl hsl;
    hsl.lightness = (high + low) / 2;
    if (high != low) {
        hsl.saturation =
            hsl.lightness <= 0.5 ? (high - low) / (high + low) : (high - low) / (2 - high - low);
        hsl.hue = FindHue(r, g, b, high, low);
    }
    return hsl;
}

std::uint8_t ChannelFromHue(double p, double q, double hue) {
    const double h = hue < 0 ? hue + 1 : hue > 1 ? hue - 1 : hue;
    double channel = p;
    if (6 * h < 1) {
        channel = p + (q - p) * 6 * h;
    } else if (2 * h < 1) {
        channel = q;
    } else if (3 * h < 2) {
        channel = p + (q - p) * (2.0 / 3.0 - h) * 6;
    }
    return Clamp8(RoundHalfEven(255 * channel));
}

/// Of parts that HslFromRGB gave, which are within 0 and 1.
TRGB RGBFromHsl(const THsl& hsl) {
    const double s = std::clamp(hsl.saturation, 0.0, 1.0);
    const double l = std::clamp(hsl.lightness, 0.0, 1.0);
    if (s == 0) {
        const std::uint8_t gray = Clamp8(RoundHalfEven(255 * l));
        return TRGB{gray, gray, gray};
    }
    const double q = l <= 0.5 ? l * (1 + s) : l + s - l * s;
    const double p = 2 * l - q;
    return TRGB{ChannelFromHue(p, q, hsl.hue - 1.0 / 3.0), ChannelFromHue(p, q, hsl.hue),
                ChannelFromHue(p, q, hsl.hue + 1.0 / 3.0)};
}

TRGB BlendHsl(TRGB source, TRGB dest, std::uint8_t operation) {
    const THsl a = HslFromRGB(source);
    const THsl b = HslFromRGB(dest);
    switch (operation) {
        case zmlHue: return RGBFromHsl(THsl{a.hue, b.saturation, b.lightness});
        case zmlSaturation: return RGBFromHsl(THsl{b.hue, a.saturation, b.lightness});
        case zmlColor: return RGBFromHsl(THsl{a.hue, a.saturation, b.lightness});
        default: return RGBFromHsl(THsl{b.hue, b.saturation, a.lightness});
    }
}

/// Luminance of the source, chrominance of the destination.
TRGB BlendLuminance(TRGB source, TRGB dest) {
    const double y = 0.299 * source.r + 0.587 * source.g + 0.114 * source.b;
    const double cb = -0.16874 * dest.r - 0.33126 * dest.g + 0.5 * dest.b + 128;
    const double cr = 0.5 * dest.r - 0.41869 * dest.g - 0.08131 * dest.b + 128;
    const double r = y + 1.402 * (cr - 128);
    const double g = y - 0.34414 * (cb - 128) - 0.71414 * (cr - 128);
    const double b = y + 1.772 * (cb - 128);
    return TRGB{Clamp8(TruncToInt(b)), Clamp8(TruncToInt(g)), Clamp8(TruncToInt(r))};
}

// Stereo: the destination is the left eye's picture, the source the right eye's.

TRGB StereoGray(TRGB source, TRGB dest) {
    const TZmRowContext context = MakeRowContext(nullptr);
    const std::uint8_t right = GrayByCoef(source, context);
    return TRGB{right, right, GrayByCoef(dest, context)};
}

std::uint8_t WeighEyes(const double (&weights)[6], TRGB left, TRGB right) {
    const double sum = weights[0] * left.r + weights[1] * left.g + weights[2] * left.b +
                       weights[3] * right.r + weights[4] * right.g + weights[5] * right.b;
    return Clamp8(RoundHalfEven(sum));
}

TRGB StereoDubois(TRGB source, TRGB dest) {
    constexpr double kRed[] = {0.4561, 0.500484, 0.176381, -0.043471, -0.087939, -0.001555};
    constexpr double kGreen[] = {-0.040082, -0.037825, -0.015759, 0.378476, 0.73364, -0.01845};
    constexpr double kBlue[] = {-0.015216, -0.020597, -0.005469, -0.072153, -0.112961, 1.2264};
    return TRGB{WeighEyes(kBlue, dest, source), WeighEyes(kGreen, dest, source),
                WeighEyes(kRed, dest, source)};
}

/// The operations that look at whole pixels.
TRGB BlendColors(TRGB source, TRGB dest, std::uint8_t operation, std::uint8_t row) {
    const bool is_even_row = (row & 1) == 0;
    switch (operation) {
        case zmlSoftLight: return SoftLight(source, dest);
        case zmlRed: return TRGB{dest.b, dest.g, source.r};
        case zmlGreen: return TRGB{dest.b, source.g, dest.r};
        case zmlBlue: return TRGB{source.b, dest.g, dest.r};
        case zmlHue:
        case zmlSaturation:
        case zmlColor:
        case zmlLuminosity: return BlendHsl(source, dest, operation);
        case zmlStereoBW: return StereoGray(source, dest);
        case zmlStereoColorDubois: return StereoDubois(source, dest);
        case zmlStereoEven: return is_even_row ? source : dest;
        case zmlStereoOdd: return is_even_row ? dest : source;
        case zmlLuminosity2: return BlendLuminance(source, dest);
        default:  // Required: zmlStereoColor is zmlNormal here, its eyes are joined elsewhere
            return source;
    }
}

}  // namespace

void ZmBlendPixel(TRGB source, TRGB& dest, std::uint8_t operation, std::uint8_t row) {
    if (operation >= kRenderOperationCount) {
        return;
    }
    if (operation > zmlStamp || operation == zmlSoftLight) {
        dest = BlendColors(source, dest, operation, row);
        return;
    }
    dest = TRGB{LowByte(BlendChannel(source.b, dest.b, operation)),
                LowByte(BlendChannel(source.g, dest.g, operation)),
                LowByte(BlendChannel(source.r, dest.r, operation))};
}

void BlendRowPlain(const TRGB* source, TRGB* dest, std::int32_t width, std::uint8_t operation,
                   std::uint8_t row) {
    for (std::int32_t x = 0; x < width; ++x) {
        ZmBlendPixel(source[x], dest[x], operation, row);
    }
}

void SoftLightRow(const TRGB* source, TRGB* dest, std::int32_t width) {
    static const TSoftLightTable table = MakeSoftLightTable();
    for (std::int32_t x = 0; x < width; ++x) {
        const auto& channels = table[source[x].r];
        dest[x] = TRGB{channels[dest[x].b], channels[dest[x].g], channels[dest[x].r]};
    }
}

void MixRowPlain(const TRGB* source, const std::uint8_t* alpha, const TMixRule& rule, TRGB* dest,
                 std::int32_t width) {
    for (std::int32_t x = 0; x < width; ++x) {
        const std::uint8_t weight = rule.WeightOf(alpha[x]);
        dest[x] = TRGB{MixChannel(source[x].b, dest[x].b, weight),
                       MixChannel(source[x].g, dest[x].g, weight),
                       MixChannel(source[x].r, dest[x].r, weight)};
    }
}

}  // namespace zm
