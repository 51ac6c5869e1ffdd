#include <algorithm>
#include <cmath>
#include <exception>
#include <string>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/console.h"

/// make_sample FILE [WIDTH HEIGHT]: draws a mountain lake at sunset and saves it in the format
/// that the file's extension names. Every point is computed, so that any size has fine detail
/// and smooth slopes, as a photo has.
///
/// make_sample --logo FILE: draws a round badge with a transparent margin, for laying over
/// pictures; a format with transparency has to be named.
namespace zm {
namespace {

constexpr std::int32_t kDefaultWidth = 1600;
constexpr std::int32_t kDefaultHeight = 1067;
constexpr std::int32_t kMaxSide = 30000;
constexpr double kHorizon = 0.62;  // of the height, from the top
constexpr double kPi = 3.14159265358979323846;

struct TColorF {
    double r = 0;
    double g = 0;
    double b = 0;
};

TColorF Mix(const TColorF& from, const TColorF& to, double share) {
    share = std::clamp(share, 0.0, 1.0);
    return {from.r + (to.r - from.r) * share, from.g + (to.g - from.g) * share,
            from.b + (to.b - from.b) * share};
}

/// Even noise in [0, 1) from two integers: the grain of the picture.
double Noise(std::int32_t x, std::int32_t y) {
    std::uint32_t mix = static_cast<std::uint32_t>(x) * 0x9E3779B1u;
    mix ^= static_cast<std::uint32_t>(y) * 0x85EBCA77u;
    mix ^= mix >> 15;
    mix *= 0x2C1B3C6Du;
    mix ^= mix >> 13;
    return static_cast<double>(mix >> 8) / 16777216.0;
}

/// A mountain range: how high its ridge stands above the horizon at `u` (0 left, 1 right), as a
/// part of the height. Waves of falling height and rising frequency make peaks on peaks.
struct TRange {
    double height;
    double phase;
    TColorF color;
};

double RidgeHeight(const TRange& range, double u) {
    double sum = 0.0;
    double weight = 0.5;
    double frequency = 1.3;
    for (int octave = 0; octave < 7; ++octave) {
        sum += weight * std::abs(std::sin(kPi * frequency * u + range.phase * (octave + 1)));
        weight *= 0.52;
        frequency *= 2.1;
    }
    return range.height * sum;
}

// From far to near: the farther, the more the light of the sky lies over it.
const std::vector<TRange> kRanges = {
    {0.34, 0.9, {168, 122, 142}},
    {0.25, 2.3, {112, 84, 120}},
    {0.15, 4.1, {58, 50, 84}},
};

TColorF SkyColor(double u, double v, double aspect) {
    const double share = v / kHorizon;
    TColorF color = Mix({38, 52, 112}, {250, 176, 112}, share * share);
    const double distance = std::hypot((u - 0.68) * aspect, v - 0.40);
    color = Mix(color, {255, 214, 150}, 0.75 * std::exp(-distance * 7.0));
    if (distance < 0.045) {
        color = Mix(color, {255, 246, 220}, (0.045 - distance) * 400.0);
    }
    return color;
}

/// What stands above the horizon at (u, v): sky, or the nearest range that reaches so high.
TColorF LandColor(double u, double v, double aspect, const std::vector<double>& ridges) {
    TColorF color = SkyColor(u, v, aspect);
    for (std::size_t i = 0; i < kRanges.size(); ++i) {
        const double depth = v - (kHorizon - ridges[i]);
        if (depth > 0.0) {
            color = Mix(kRanges[i].color, {30, 34, 52}, depth * 2.2);
        }
    }
    return color;
}

/// The lake mirrors what stands above it, in ripples that grow toward the viewer.
TColorF LakeColor(double u, double v, double aspect, const std::vector<double>& ridges) {
    const double depth = (v - kHorizon) / (1.0 - kHorizon);
    const double ripple = 0.02 * depth * std::sin(260.0 * std::sqrt(depth) + 9.0 * u);
    const double mirrored = std::clamp(2.0 * kHorizon - v + ripple, 0.0, kHorizon);
    const TColorF color = LandColor(u, mirrored, aspect, ridges);
    return Mix(color, {18, 32, 64}, 0.18 + 0.5 * depth);
}

std::uint8_t ChannelByte(double value, double grain) {
    return Clamp8(TruncToInt(value + grain));
}

void DrawRow(TZmBitmap& bitmap, std::int32_t y, const std::vector<std::vector<double>>& ridges) {
    const std::int32_t width = bitmap.GetWidth();
    const double aspect = static_cast<double>(width) / bitmap.GetHeight();
    const double v = (y + 0.5) / bitmap.GetHeight();
    TRGB* pixel = reinterpret_cast<TRGB*>(bitmap.GetScanLine(y));
    for (std::int32_t x = 0; x < width; ++x) {
        const double u = (x + 0.5) / width;
        const std::vector<double>& column = ridges[static_cast<std::size_t>(x)];
        const TColorF color =
            v < kHorizon ? LandColor(u, v, aspect, column) : LakeColor(u, v, aspect, column);
        const double grain = Noise(x, y) * 6.0 - 2.5;
        pixel[x].r = ChannelByte(color.r, grain);
        pixel[x].g = ChannelByte(color.g, grain);
        pixel[x].b = ChannelByte(color.b, grain);
    }
}

bool DrawPicture(TZmBitmap& bitmap, std::int32_t width, std::int32_t height) {
    if (!bitmap.Allocate(width, height, zm24RGB)) {
        return false;
    }
    std::vector<std::vector<double>> ridges(static_cast<std::size_t>(width));
    for (std::int32_t x = 0; x < width; ++x) {
        for (const TRange& range : kRanges) {
            ridges[static_cast<std::size_t>(x)].push_back(RidgeHeight(range, (x + 0.5) / width));
        }
    }
    for (std::int32_t y = 0; y < height; ++y) {
        DrawRow(bitmap, y, ridges);
    }
    return true;
}

// The badge: two mountains before an evening sky, in a white ring.
constexpr std::int32_t kBadgeSide = 160;
constexpr double kBadgeRadius = 64.0;
constexpr double kBadgeRing = 6.0;
constexpr std::int32_t kSamples = 4;  // a side: colours are the mean of points within a pixel

/// At x, y from the middle, in radii, y upward.
TColorF BadgeColor(double x, double y) {
    const double ridge = std::max(0.35 - 0.9 * std::abs(x - 0.25), 0.1 - 0.8 * std::abs(x + 0.4));
    if (y < -0.45) {
        return {36, 66, 110};
    }
    if (y < ridge) {
        return y > ridge - 0.18 ? TColorF{244, 246, 250} : TColorF{72, 76, 118};
    }
    return Mix({250, 186, 110}, {222, 100, 92}, y);
}

/// Means over the points of one pixel; alpha is the part of them that lie on the badge.
void DrawBadgePixel(TZmBitmap& bitmap, std::int32_t px, std::int32_t py) {
    TColorF sum;
    std::int32_t count = 0;
    for (std::int32_t i = 0; i < kSamples * kSamples; ++i) {
        const double x = px + (i % kSamples + 0.5) / kSamples - kBadgeSide / 2.0;
        const double y = kBadgeSide / 2.0 - py - (i / kSamples + 0.5) / kSamples;
        const double distance = std::hypot(x, y);
        if (distance >= kBadgeRadius) {
            continue;
        }
        const TColorF color = distance > kBadgeRadius - kBadgeRing
                                  ? TColorF{255, 255, 255}
                                  : BadgeColor(x / kBadgeRadius, y / kBadgeRadius);
        sum = {sum.r + color.r, sum.g + color.g, sum.b + color.b};
        ++count;
    }
    bitmap.SetAlpha(px, py, Clamp8(255 * count / (kSamples * kSamples)));
    if (count > 0) {
        bitmap.SetPixels(
            px, py,
            TRGB{Clamp8(RoundHalfEven(sum.b / count)), Clamp8(RoundHalfEven(sum.g / count)),
                 Clamp8(RoundHalfEven(sum.r / count))});
    }
}

bool DrawBadge(TZmBitmap& bitmap) {
    if (!bitmap.Allocate(kBadgeSide, kBadgeSide, /*fill_color=*/0, /*alpha=*/0)) {
        return false;
    }
    for (std::int32_t y = 0; y < kBadgeSide; ++y) {
        for (std::int32_t x = 0; x < kBadgeSide; ++x) {
            DrawBadgePixel(bitmap, x, y);
        }
    }
    return true;
}

/// A side from 1 to kMaxSide; 0 when the text is none.
std::int32_t ParseSide(const std::string& text) {
    const bool digits = !text.empty() && text.size() <= 5 &&
                        text.find_first_not_of("0123456789") == std::string::npos;
    const std::int32_t value = digits ? std::stoi(text) : 0;
    return value <= kMaxSide ? value : 0;
}

int Main(const std::vector<std::string>& arguments) {
    const bool is_badge = arguments.size() == 3 && arguments[1] == "--logo";
    const bool sized = arguments.size() == 4;
    const std::int32_t width = sized ? ParseSide(arguments[2]) : kDefaultWidth;
    const std::int32_t height = sized ? ParseSide(arguments[3]) : kDefaultHeight;
    if ((!sized && !is_badge && arguments.size() != 2) || width < 1 || height < 1) {
        platform::WriteStderr(
            "usage: make_sample FILE [WIDTH HEIGHT]\n       make_sample --logo FILE\n");
        return 2;
    }
    TZmBitmap bitmap;
    if (is_badge ? !DrawBadge(bitmap) : !DrawPicture(bitmap, width, height)) {
        platform::WriteStderr("make_sample: no memory for the picture\n");
        return 1;
    }
    const std::string& name = arguments[is_badge ? 2 : 1];
    if (!bitmap.Write(Utf16FromUtf8(name), nullptr)) {
        platform::WriteStderr("make_sample: cannot write " + name + "\n");
        return 1;
    }
    return 0;
}

}  // namespace
}  // namespace zm

int main(int argc, char** argv) {
    try {
        return zm::Main(zm::platform::ProgramArguments(argc, argv));
    } catch (const std::exception& error) {
        zm::platform::WriteStderr(std::string("make_sample: ") + error.what() + "\n");
        return 1;
    }
}
