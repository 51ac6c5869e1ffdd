#include "engine/bitmap/zmrgbpixels_p.h"

#include <algorithm>
#include <cstring>

#include "engine/bitmap/zmpixelformats.h"

namespace zm {
namespace {

constexpr std::uint8_t kWhiteFromGray = 128;

std::int64_t PixelOffset(std::int32_t x, TZmPixelFormat format) {
    return std::int64_t{x} * (PixelFormatInfo(format).bit_count / 8);
}

std::int32_t SquaredDistance(TRGB a, TRGB b) {
    const std::int32_t red = a.r - b.r;
    const std::int32_t green = a.g - b.g;
    const std::int32_t blue = a.b - b.b;
    return red * red + green * green + blue * blue;
}

std::uint8_t NearestEntry(TRGB color, const TRGB* palette, std::int32_t used) {
    std::int32_t best = 0;
    std::int32_t best_distance = 4 * 255 * 255;
    for (std::int32_t i = 0; i < used && best_distance > 0; ++i) {
        const std::int32_t distance = SquaredDistance(color, palette[i]);
        if (distance < best_distance) {
            best = i;
            best_distance = distance;
        }
    }
    return static_cast<std::uint8_t>(best);
}

void StoreBits(const TRGB* pixels, std::uint8_t* row, std::int32_t x, std::int32_t width,
               const TZmRowContext& context) {
    for (std::int32_t i = 0; i < width; ++i) {
        std::uint8_t& byte = row[(x + i) >> 3];
        const int bit = 0x80 >> ((x + i) & 7);
        const bool is_set = GrayByCoef(pixels[i], context) >= kWhiteFromGray;
        byte = static_cast<std::uint8_t>(is_set ? byte | bit : byte & ~bit);
    }
}

/// Neighbours mostly have the same colour, so the last answer is tried first.
void StoreIndexes(const TRGB* pixels, std::uint8_t* row, std::int32_t width,
                  const TZmRowLayout& layout) {
    if (layout.palette == nullptr) {
        return;
    }
    const std::int32_t used = std::clamp(layout.palette_used, 1, 256);
    for (std::int32_t i = 0; i < width; ++i) {
        row[i] = i > 0 && pixels[i] == pixels[i - 1]
                     ? row[i - 1]
                     : NearestEntry(pixels[i], layout.palette, used);
    }
}

}  // namespace

void LoadRGBPixels(const std::uint8_t* row, std::int32_t x, std::int32_t width,
                   const TZmRowLayout& layout, TRGB* pixels) {
    const TZmRowFunction convert = FindRowFunction(layout.format, zm24RGB);
    const bool has_whole_bytes = layout.format != zm1g;
    const bool has_palette = layout.format != zm8p || layout.palette != nullptr;
    if (layout.format == zm24RGB) {
        std::memcpy(static_cast<void*>(pixels), row + PixelOffset(x, zm24RGB),
                    static_cast<std::size_t>(width) * sizeof(TRGB));
    } else if (convert != nullptr && has_whole_bytes && has_palette) {
        TZmRowContext context = layout.context;
        context.palette = layout.palette;
        convert(row + PixelOffset(x, layout.format), reinterpret_cast<std::uint8_t*>(pixels), width,
                context);
    } else {
        for (std::int32_t i = 0; i < width; ++i) {
            pixels[i] = RowPixelToRGB(row, x + i, layout.format, layout.palette);
        }
    }
}

void StoreRGBPixels(const TRGB* pixels, std::uint8_t* row, std::int32_t x, std::int32_t width,
                    const TZmRowLayout& layout) {
    std::uint8_t* const first = row + PixelOffset(x, layout.format);
    if (layout.format == zm1g) {
        StoreBits(pixels, row, x, width, layout.context);
    } else if (layout.format == zm8p) {
        StoreIndexes(pixels, first, width, layout);
    } else if (layout.format == zm24RGB) {
        std::memcpy(first, pixels, static_cast<std::size_t>(width) * sizeof(TRGB));
    } else if (const TZmRowFunction convert = FindRowFunction(zm24RGB, layout.format)) {
        convert(reinterpret_cast<const std::uint8_t*>(pixels), first, width, layout.context);
    }
}

}  // namespace zm
