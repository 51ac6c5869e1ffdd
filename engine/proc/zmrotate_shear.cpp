// Rotation by three shears, plain: rows are moved, then columns, then rows again. A line that
// moves by a fraction of a pixel mixes each pixel with the one before it, in 4096ths.

#include <cmath>
#include <new>
#include <numbers>

#include "engine/proc/zmrotate_p.h"

namespace zm {
namespace {

constexpr std::int32_t kFractionBits = 12;
constexpr std::int32_t kFractionOne = 1 << kFractionBits;

/// An image in memory, `channels` bytes a pixel, without padding.
struct TShearImage {
    std::int64_t width = 0;
    std::int64_t height = 0;
    std::int64_t channels = 0;
    std::vector<std::uint8_t> bytes;

    std::uint8_t* Pixel(std::int64_t x, std::int64_t y) {
        return bytes.data() + (y * width + x) * channels;
    }
};

using TBackground = std::array<std::uint8_t, 3>;

TShearImage MakeShearImage(std::int64_t width, std::int64_t height, std::int64_t channels,
                           TBackground background) {
    TShearImage image{width, height, channels, {}};
    const auto row_bytes = CheckedMul(width, channels);
    const auto byte_count = row_bytes ? CheckedMul(*row_bytes, height) : std::nullopt;
    if (!byte_count) {
        throw std::bad_alloc();
    }
    image.bytes = MakeWorkBuffer<std::uint8_t>(*byte_count);
    for (std::size_t i = 0; i < image.bytes.size(); ++i) {
        image.bytes[i] = background[i % static_cast<std::size_t>(channels)];
    }
    return image;
}

/// A line of pixels that lie `step` bytes apart.
struct TShearLine {
    std::uint8_t* first = nullptr;
    std::int64_t step = 0;
    std::int64_t count = 0;
};

/// Lays the pixels of a line into a longer one that holds the background, moved by `shift` less
/// `offset` pixels. What falls outside is dropped.
void LayLine(const TShearLine& from, const TShearLine& to, TShearShift shift, std::int32_t offset,
             std::int64_t channels, bool has_antialias, const TBackground& background) {
    const std::int32_t f = shift.fraction_q12;
    const std::int32_t g = kFractionOne - f;
    const std::int64_t start = std::int64_t{shift.whole} - offset;
    const bool has_end = has_antialias && f > 0;
    for (std::int64_t i = 0; i < from.count + (has_end ? 1 : 0); ++i) {
        if (start + i < 0 || start + i >= to.count) {
            continue;
        }
        std::uint8_t* const out = to.first + (start + i) * to.step;
        for (std::int64_t c = 0; c < channels; ++c) {
            const std::uint8_t ground = background[static_cast<std::size_t>(c)];
            const std::int32_t current = i < from.count ? from.first[i * from.step + c] : ground;
            const std::int32_t before = i > 0 ? from.first[(i - 1) * from.step + c] : ground;
            out[c] = has_antialias
                         ? Clamp8((before * f + current * g + kFractionOne / 2) / kFractionOne)
                         : static_cast<std::uint8_t>(current);
        }
    }
}

TShearImage LoadImage(TZmBitmap& source, std::int64_t channels) {
    const bool is_bits = source.GetPixelFormat() == zm1g;
    TShearImage image =
        MakeShearImage(source.GetWidth(), source.GetHeight(), channels, TBackground{});
    for (std::int32_t y = 0; y < source.GetHeight(); ++y) {
        const std::uint8_t* const row = source.GetScanLine(y);
        for (std::int64_t i = 0; i < image.width * channels; ++i) {
            const int bit = is_bits ? row[i >> 3] >> (7 - (i & 7)) & 1 : 0;
            image.Pixel(0, y)[i] = is_bits ? static_cast<std::uint8_t>(bit) : row[i];
        }
    }
    return image;
}

void StoreImage(TShearImage& image, TZmBitmap& target) {
    const bool is_bits = target.GetPixelFormat() == zm1g;
    if (is_bits) {
        target.Fill(0.0);
    }
    for (std::int32_t y = 0; y < target.GetHeight(); ++y) {
        std::uint8_t* const row = target.GetScanLine(y);
        for (std::int64_t i = 0; i < image.width * image.channels; ++i) {
            const std::uint8_t value = image.Pixel(0, y)[i];
            if (is_bits) {
                row[i >> 3] = static_cast<std::uint8_t>(row[i >> 3] | value << (7 - (i & 7)));
            } else {
                row[i] = value;
            }
        }
    }
}

bool FitsInt32(double value) {
    return value >= 0 && value < kMaxInt32;
}

}  // namespace

TShearAngle SplitShearAngle(double angle) {
    TShearAngle split;
    split.rest = std::fmod(std::trunc(angle * 1000), 360000.0) / 1000;
    if (!std::isfinite(split.rest)) {
        split.rest = 0;
    }
    while (split.rest > 45) {
        split.rest -= 90;
        ++split.turns;
    }
    while (split.rest < -45) {
        split.rest += 90;
        --split.turns;
    }
    split.turns = (split.turns + 8) % 4;
    return split;
}

std::optional<TShearGeometry> FindShearGeometry(TZmImageSize source, double rest) {
    const double radians = rest * std::numbers::pi / 180;
    TShearGeometry geometry;
    geometry.tangent = std::fabs(std::tan(radians / 2));
    geometry.sine = std::fabs(std::sin(radians));
    geometry.is_negative = radians < 0;
    geometry.width = source.width;
    geometry.height = source.height;
    const double width = source.width;
    const double height = source.height;
    const double w1 = std::nearbyint(height * geometry.tangent + width + 1);
    const double o2 = std::nearbyint((w1 - width) * geometry.sine);
    const double h2 = std::nearbyint(w1 * geometry.sine + height + 1);
    const double o3 = std::nearbyint((h2 - height - o2) * geometry.tangent);
    const double h3 = std::nearbyint(h2 - 2 * o2);
    const double w3 = std::nearbyint(h3 * geometry.tangent + w1 + 1 - 2 * o3);
    if (!FitsInt32(w1) || !FitsInt32(o2) || !FitsInt32(o3) || !FitsInt32(h3) || !FitsInt32(w3)) {
        return std::nullopt;
    }
    geometry.w1 = TruncToInt(w1);
    geometry.o2 = TruncToInt(o2);
    geometry.h3 = TruncToInt(h3);
    geometry.o3 = TruncToInt(o3);
    geometry.w3 = TruncToInt(w3);
    return geometry;
}

TShearShift FindShearShift(double distance) {
    TShearShift shift;
    shift.whole = TruncToInt(distance);
    shift.fraction_q12 = TruncToInt((distance - shift.whole) * kFractionOne);
    return shift;
}

TShearShift FirstShift(const TShearGeometry& geometry, std::int32_t y) {
    const double distance = geometry.is_negative ? geometry.height - static_cast<double>(y) : y;
    return FindShearShift(distance * geometry.tangent);
}

TShearShift SecondShift(const TShearGeometry& geometry, std::int32_t x) {
    const double distance = geometry.is_negative ? x : geometry.w1 - static_cast<double>(x);
    return FindShearShift(distance * geometry.sine);
}

TShearShift ThirdShift(const TShearGeometry& geometry, std::int32_t y) {
    const double distance = geometry.is_negative ? geometry.h3 - static_cast<double>(y) : y;
    return FindShearShift(distance * geometry.tangent);
}

std::array<std::uint8_t, 3> ShearBackground(TZmPixelFormat format, TColor background) {
    if (format == zm24RGB) {
        const TRGB rgb = RGBFromColor(background);
        return {rgb.b, rgb.g, rgb.r};
    }
    const std::int32_t value = format == zm1g ? (background != 0 ? 1 : 0) : background & 255;
    return {static_cast<std::uint8_t>(value)};
}

bool RotateByShearsPlain(TZmBitmap& source, TZmBitmap& target, double rest, TColor background,
                         const TResampleListener& listener) {
    const TZmPixelFormat format = source.GetPixelFormat();
    const auto geometry = FindShearGeometry({source.GetWidth(), source.GetHeight()}, rest);
    if (!geometry || !target.Allocate(geometry->w3, geometry->h3, format)) {
        return false;
    }
    const TShearGeometry& g = *geometry;
    const bool has_antialias = format != zm1g;
    const std::int64_t channels = format == zm24RGB ? 3 : 1;
    const TBackground ground = ShearBackground(format, background);
    TPercentReporter progress(listener, 100.0 / (double{1} * g.height + g.w1 + g.h3));
    std::int64_t units = 0;
    TShearImage image = LoadImage(source, channels);
    TShearImage first = MakeShearImage(g.w1, g.height, channels, ground);
    for (std::int32_t y = 0; y < g.height; ++y) {
        LayLine({image.Pixel(0, y), channels, g.width}, {first.Pixel(0, y), channels, g.w1},
                FirstShift(g, y), 0, channels, has_antialias, ground);
        progress.Report(++units);
    }
    TShearImage second = MakeShearImage(g.w1, g.h3, channels, ground);
    for (std::int32_t x = 0; x < g.w1; ++x) {
        LayLine({first.Pixel(x, 0), g.w1 * channels, g.height},
                {second.Pixel(x, 0), g.w1 * channels, g.h3}, SecondShift(g, x), g.o2, channels,
                has_antialias, ground);
        progress.Report(++units);
    }
    TShearImage third = MakeShearImage(g.w3, g.h3, channels, ground);
    for (std::int32_t y = 0; y < g.h3; ++y) {
        LayLine({second.Pixel(0, y), channels, g.w1}, {third.Pixel(0, y), channels, g.w3},
                ThirdShift(g, y), g.o3, channels, has_antialias, ground);
        progress.Report(++units);
    }
    StoreImage(third, target);
    return true;
}

}  // namespace zm
