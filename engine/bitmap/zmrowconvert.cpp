/// The table of row conversions. Grey weights are hundredths over 8-bit channels; 16-bit greys
/// and floats use the weights of ITU-R BT.709 in the scale that each function states.

#include "engine/bitmap/zmrowconvert.h"

#include <array>
#include <atomic>
#include <cstring>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmrowconvert_fast_p.h"
#include "engine/bitmap/zmrowconvert_p.h"
#include "engine/foundation/zmsettings.h"

namespace zm {
namespace {

constexpr std::int32_t kTableWidth = 256;   // from this width on a palette row builds a table
constexpr std::int32_t kSmallCoef = 65536;  // weights up to this keep the sum within 32 bits

std::atomic<const TZmCMYKTransform*> cmyk_transform{nullptr};

template <typename T>
T Load(const std::uint8_t* address) {
    T value;
    std::memcpy(&value, address, sizeof value);
    return value;
}

template <typename T>
void Store(std::uint8_t* address, T value) {
    std::memcpy(address, &value, sizeof value);
}

// Pixels: what one pixel of a destination format looks like.

std::array<std::uint8_t, 3> Gray24(std::uint8_t value) {
    return {value, value, value};
}
std::array<std::uint8_t, 4> Gray32(std::uint8_t value) {
    return {value, value, value, 255};
}
std::array<std::uint16_t, 3> Gray48(std::uint16_t value) {
    return {value, value, value};
}
std::uint16_t Gray16FromRGB(std::uint32_t r, std::uint32_t g, std::uint32_t b) {
    return static_cast<std::uint16_t>((r * 54484u + g * 183241u + b * 19275u) / 1000u);
}
float FloatFromRGB(double r, double g, double b) {
    return static_cast<float>((0.2126 * r + 0.7152 * g + 0.0722 * b) / 255.0);
}
/// The three words of a colour in the low 48 bits, red first.
std::uint64_t Words48FromRGB(std::uint32_t r, std::uint32_t g, std::uint32_t b) {
    return (r | g << 16 | std::uint64_t{b} << 32) * 257u;
}

std::uint8_t WeighedGray(std::int64_t r, std::int64_t g, std::int64_t b,
                         const TZmRowContext& context) {
    return static_cast<std::uint8_t>(
        (r * context.red_coef + g * context.green_coef + b * context.blue_coef) / 100);
}

bool HasSmallCoefs(const TZmRowContext& context) {
    const auto is_small = [](std::int32_t coef) { return coef >= 0 && coef <= kSmallCoef; };
    return is_small(context.red_coef) && is_small(context.green_coef) &&
           is_small(context.blue_coef);
}

/// Grey of colours that `pixel(x)` gives as a TRGB; usual weights take a 32-bit loop.
template <typename Pixel>
void GrayRow(std::uint8_t* dest, std::int32_t width, const TZmRowContext& context, Pixel&& pixel) {
    if (!HasSmallCoefs(context)) {
        for (std::int32_t x = 0; x < width; ++x) {
            const TRGB rgb = pixel(x);
            dest[x] = WeighedGray(rgb.r, rgb.g, rgb.b, context);
        }
        return;
    }
    const auto red = static_cast<std::uint32_t>(context.red_coef);
    const auto green = static_cast<std::uint32_t>(context.green_coef);
    const auto blue = static_cast<std::uint32_t>(context.blue_coef);
    for (std::int32_t x = 0; x < width; ++x) {
        const TRGB rgb = pixel(x);
        dest[x] = static_cast<std::uint8_t>((rgb.r * red + rgb.g * green + rgb.b * blue) / 100u);
    }
}

// From zm1g: four pixels at a time from a table of the sixteen half bytes.

template <std::size_t kBytes>
using TNibbleTable = std::array<std::array<std::uint8_t, kBytes * 4>, 16>;

template <std::size_t kBytes>
constexpr TNibbleTable<kBytes> MakeNibbleTable(const std::array<std::uint8_t, kBytes>& clear,
                                               const std::array<std::uint8_t, kBytes>& set) {
    TNibbleTable<kBytes> table{};
    for (std::size_t i = 0; i < kBytes * 64; ++i) {
        const std::size_t nibble = i / (kBytes * 4);
        const std::size_t pixel = i / kBytes % 4;
        const bool is_set = (nibble >> (3 - pixel) & 1) != 0;
        table[nibble][i % (kBytes * 4)] = is_set ? set[i % kBytes] : clear[i % kBytes];
    }
    return table;
}

template <std::size_t kBytes, const TNibbleTable<kBytes>& kTable>
void ExpandBits(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    std::int32_t left = width;
    for (; left >= 8; left -= 8, ++source) {
        std::memcpy(dest, kTable[*source >> 4].data(), kBytes * 4);
        std::memcpy(dest + kBytes * 4, kTable[*source & 15].data(), kBytes * 4);
        dest += kBytes * 8;
    }
    for (std::int32_t x = 0; x < left; ++x, dest += kBytes) {
        const bool is_set = (*source >> (7 - x) & 1) != 0;
        std::memcpy(dest, kTable[is_set ? 15 : 0].data(), kBytes);
    }
}

constexpr auto kBitsTo8p = MakeNibbleTable<1>({0}, {1});
constexpr auto kBitsTo8g = MakeNibbleTable<1>({0}, {255});
constexpr auto kBitsTo16g = MakeNibbleTable<2>({0, 0}, {255, 255});
constexpr auto kBitsTo24 = MakeNibbleTable<3>({0, 0, 0}, {255, 255, 255});
constexpr auto kBitsTo32f = MakeNibbleTable<4>({0, 0, 0, 0}, {0, 0, 0x80, 0x3F});  // 1.0f
constexpr auto kBitsTo48 = MakeNibbleTable<6>({0, 0, 0, 0, 0, 0}, {255, 255, 255, 255, 255, 255});
constexpr auto kBitsTo32 = MakeNibbleTable<4>({0, 0, 0, 255}, {255, 255, 255, 255});

// From zm8p.

/// Replaces each byte by `pixel(byte)`; wide rows compute the 256 pixels once.
template <typename T, typename Pixel>
void MapBytes(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width, Pixel&& pixel) {
    if (width < kTableWidth) {
        for (std::int32_t x = 0; x < width; ++x, dest += sizeof(T)) {
            Store<T>(dest, pixel(source[x]));
        }
        return;
    }
    std::array<T, 256> table;
    for (std::size_t i = 0; i < table.size(); ++i) {
        table[i] = pixel(static_cast<std::uint8_t>(i));
    }
    for (std::int32_t x = 0; x < width; ++x, dest += sizeof(T)) {
        Store<T>(dest, table[source[x]]);
    }
}

void Row8pTo8g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    MapBytes<std::uint8_t>(source, dest, width, [&context](std::uint8_t index) {
        return GrayByCoef(context.palette[index], context);
    });
}
void Row8pTo16g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext& context) {
    MapBytes<std::uint16_t>(source, dest, width, [&context](std::uint8_t index) {
        const TRGB rgb = context.palette[index];
        return Gray16FromRGB(rgb.r, rgb.g, rgb.b);
    });
}
void Row8pTo24(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    for (std::int32_t x = 0; x < width; ++x, dest += 3) {
        std::memcpy(dest, &context.palette[source[x]], 3);
    }
}
void Row8pTo32f(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext& context) {
    MapBytes<float>(source, dest, width, [&context](std::uint8_t index) {
        const TRGB rgb = context.palette[index];
        return FloatFromRGB(rgb.r, rgb.g, rgb.b);
    });
}
void Row8pTo48(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    for (std::int32_t x = 0; x < width; ++x, dest += 6) {
        const TRGB rgb = context.palette[source[x]];
        const std::uint64_t words = Words48FromRGB(rgb.r, rgb.g, rgb.b);
        std::memcpy(dest, &words, 6);
    }
}
void Row8pTo32(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    MapBytes<TRGBA>(source, dest, width, [&context](std::uint8_t index) {
        const TRGB rgb = context.palette[index];
        return TRGBA{rgb.b, rgb.g, rgb.r, 255};
    });
}

// From zm8g and zm16g.

void RowCopy8(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
              const TZmRowContext&) {
    std::memcpy(dest, source, static_cast<std::size_t>(width));
}
void Row8gTo16g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        dest[2 * x] = source[x];
        dest[2 * x + 1] = source[x];
    }
}
void Row8gTo24(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 3 * x, Gray24(source[x]));
    }
}
void Row8gTo32f(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 4 * x, static_cast<float>(source[x] / 255.0));
    }
}
void Row8gTo48(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        std::memset(dest + 6 * x, source[x], 6);
    }
}
void Row8gTo32(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 4 * x, source[x] * 0x010101u | 0xFF000000u);
    }
}
void Row16gTo8g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        dest[x] = static_cast<std::uint8_t>(Load<std::uint16_t>(source + 2 * x) >> 8);
    }
}
void Row16gTo24(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 3 * x, Gray24(source[2 * x + 1]));
    }
}
void Row16gTo32f(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                 const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 4 * x, static_cast<float>(Load<std::uint16_t>(source + 2 * x) / 65535.0));
    }
}
void Row16gTo48(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 6 * x, Gray48(Load<std::uint16_t>(source + 2 * x)));
    }
}
void Row16gTo32(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 4 * x, Gray32(source[2 * x + 1]));
    }
}

// From zm24RGB.

void Row24To8g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    GrayRow(dest, width, context, [source](std::int32_t x) {
        return TRGB{source[3 * x], source[3 * x + 1], source[3 * x + 2]};
    });
}
void Row24To16g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x, source += 3, dest += 2) {
        Store(dest, Gray16FromRGB(source[2], source[1], source[0]));
    }
}
void Row24To32f(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x, source += 3, dest += 4) {
        Store(dest, FloatFromRGB(source[2], source[1], source[0]));
    }
}
/// All pixels but the last are moved as eight bytes, of which the next store takes two back.
void Row24To48(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    for (std::int32_t x = 1; x < width; ++x, source += 3, dest += 6) {
        Store(dest, Words48FromRGB(source[2], source[1], source[0]));
    }
    if (width > 0) {
        const std::uint64_t words = Words48FromRGB(source[2], source[1], source[0]);
        std::memcpy(dest, &words, 6);
    }
}
/// Four pixels at a time: three 32-bit words in, four out.
void Row24To32(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    constexpr std::uint32_t kOpaque = 0xFF000000u;
    for (; width >= 4; width -= 4, source += 12, dest += 16) {
        const auto first = Load<std::uint32_t>(source);
        const auto second = Load<std::uint32_t>(source + 4);
        const auto third = Load<std::uint32_t>(source + 8);
        Store(dest, first | kOpaque);
        Store(dest + 4, first >> 24 | second << 8 | kOpaque);
        Store(dest + 8, second >> 16 | third << 16 | kOpaque);
        Store(dest + 12, third >> 8 | kOpaque);
    }
    for (; width > 0; --width, source += 3, dest += 4) {
        std::memcpy(dest, source, 3);
        dest[3] = 255;
    }
}

// From zm32f.

void Row32fTo8g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        dest[x] = static_cast<std::uint8_t>(UnitToInteger(Load<float>(source + 4 * x), 255.0));
    }
}
void Row32fTo16g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                 const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        Store(dest + 2 * x,
              static_cast<std::uint16_t>(UnitToInteger(Load<float>(source + 4 * x), 65535.0)));
    }
}
void Row32fTo24(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        const std::int32_t value = UnitToInteger(Load<float>(source + 4 * x), 255.0);
        Store(dest + 3 * x, Gray24(static_cast<std::uint8_t>(value)));
    }
}
void Row32fTo48(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        const std::int32_t value = UnitToInteger(Load<float>(source + 4 * x), 65535.0);
        Store(dest + 6 * x, Gray48(static_cast<std::uint16_t>(value)));
    }
}
void Row32fTo32(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x) {
        const std::int32_t value = UnitToInteger(Load<float>(source + 4 * x), 255.0);
        Store(dest + 4 * x, Gray32(static_cast<std::uint8_t>(value)));
    }
}

// From zm48RGB; byte 2 * channel + 1 is a channel's high byte.

void Row48To8g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    GrayRow(dest, width, context, [source](std::int32_t x) {
        return TRGB{source[6 * x + 5], source[6 * x + 3], source[6 * x + 1]};
    });
}
void Row48To16g(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x, source += 6, dest += 2) {
        const auto pixel = Load<TRGB48>(source);
        Store(dest, static_cast<std::uint16_t>((pixel.r * 212u + pixel.g * 713u + pixel.b * 75u) /
                                               1000u));
    }
}
void Row48To24(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x, source += 6, dest += 3) {
        dest[0] = source[5];
        dest[1] = source[3];
        dest[2] = source[1];
    }
}
void Row48To32f(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x, source += 6, dest += 4) {
        const auto pixel = Load<TRGB48>(source);
        const double sum =
            0.2126 * pixel.r / 256.0 + 0.7152 * pixel.g / 256.0 + 0.0722 * pixel.b / 256.0;
        Store(dest, static_cast<float>(sum / 255.0));
    }
}
void Row48To32(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    for (std::int32_t x = 0; x < width; ++x, source += 6, dest += 4) {
        dest[0] = source[5];
        dest[1] = source[3];
        dest[2] = source[1];
        dest[3] = 255;
    }
}

// From zm32RGB. All pixels but the last are moved as four bytes, of which the next store takes
// one back.

void Row32To24(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext&) {
    for (std::int32_t x = 1; x < width; ++x, source += 4, dest += 3) {
        Store(dest, Load<std::uint32_t>(source));
    }
    if (width > 0) {
        std::memcpy(dest, source, 3);
    }
}

using TFunctionTable = std::array<std::array<TZmRowFunction, kPixelFormatCount>, kPixelFormatCount>;

constexpr TFunctionTable MakeFunctionTable() {
    TFunctionTable table{};
    table[zm1g][zm8p] = ExpandBits<1, kBitsTo8p>;
    table[zm1g][zm8g] = ExpandBits<1, kBitsTo8g>;
    table[zm1g][zm16g] = ExpandBits<2, kBitsTo16g>;
    table[zm1g][zm24RGB] = ExpandBits<3, kBitsTo24>;
    table[zm1g][zm32f] = ExpandBits<4, kBitsTo32f>;
    table[zm1g][zm48RGB] = ExpandBits<6, kBitsTo48>;
    table[zm1g][zm32RGB] = ExpandBits<4, kBitsTo32>;
    table[zm8p][zm8g] = Row8pTo8g;
    table[zm8p][zm16g] = Row8pTo16g;
    table[zm8p][zm24RGB] = Row8pTo24;
    table[zm8p][zm32f] = Row8pTo32f;
    table[zm8p][zm48RGB] = Row8pTo48;
    table[zm8p][zm32RGB] = Row8pTo32;
    table[zm8g][zm8p] = RowCopy8;
    table[zm8g][zm16g] = Row8gTo16g;
    table[zm8g][zm24RGB] = Row8gTo24;
    table[zm8g][zm32f] = Row8gTo32f;
    table[zm8g][zm48RGB] = Row8gTo48;
    table[zm8g][zm32RGB] = Row8gTo32;
    table[zm16g][zm8p] = Row16gTo8g;
    table[zm16g][zm8g] = Row16gTo8g;
    table[zm16g][zm24RGB] = Row16gTo24;
    table[zm16g][zm32f] = Row16gTo32f;
    table[zm16g][zm48RGB] = Row16gTo48;
    table[zm16g][zm32RGB] = Row16gTo32;
    table[zm24RGB][zm8g] = Row24To8g;
    table[zm24RGB][zm16g] = Row24To16g;
    table[zm24RGB][zm32f] = Row24To32f;
    table[zm24RGB][zmCMYK] = Row24RGBToCMYK;
    table[zm24RGB][zm48RGB] = Row24To48;
    table[zm24RGB][zmCIELab] = Row24RGBToCIELab;
    table[zm24RGB][zm32RGB] = Row24To32;
    table[zm32f][zm8p] = Row32fTo8g;
    table[zm32f][zm8g] = Row32fTo8g;
    table[zm32f][zm16g] = Row32fTo16g;
    table[zm32f][zm24RGB] = Row32fTo24;
    table[zm32f][zm48RGB] = Row32fTo48;
    table[zm32f][zm32RGB] = Row32fTo32;
    table[zmCMYK][zm24RGB] = RowCMYKTo24RGB;
    table[zmCMYK][zm32RGB] = RowCMYKTo32RGB;
    table[zm48RGB][zm8g] = Row48To8g;
    table[zm48RGB][zm16g] = Row48To16g;
    table[zm48RGB][zm24RGB] = Row48To24;
    table[zm48RGB][zm32f] = Row48To32f;
    table[zm48RGB][zm32RGB] = Row48To32;
    table[zmCIELab][zm24RGB] = RowCIELabTo24RGB;
    table[zmCIELab][zm32RGB] = RowCIELabTo32RGB;
    table[zm32RGB][zm24RGB] = Row32To24;
    return table;
}

constexpr TFunctionTable kRowFunctions = MakeFunctionTable();

}  // namespace

void SetCMYKTransform(const TZmCMYKTransform* transform) {
    cmyk_transform.store(transform);
}

/// Each store writes a byte too many, which the next one takes back. A copy of the palette has
/// that byte behind its last entry too.
void Row8pTo24Fast(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                   const TZmRowContext& context) {
    if (width < kTableWidth) {
        Row8pTo24(source, dest, width, context);
        return;
    }
    std::array<std::uint8_t, 3 * 256 + 1> colors;
    std::memcpy(colors.data(), context.palette, 3 * 256);
    colors.back() = 0;
    for (std::int32_t x = 1; x < width; ++x, dest += 3) {
        Store(dest, Load<std::uint32_t>(colors.data() + 3 * *source++));
    }
    std::memcpy(dest, colors.data() + 3 * *source, 3);
}

TZmRowFunction FindRowFunction(TZmPixelFormat from, TZmPixelFormat to) {
    const TZmRowFunction fast = FindFastRowFunction(from, to);
    return fast != nullptr ? fast : FindPlainRowFunction(from, to);
}

TZmRowFunction FindPlainRowFunction(TZmPixelFormat from, TZmPixelFormat to) {
    return from < kPixelFormatCount && to < kPixelFormatCount ? kRowFunctions[from][to] : nullptr;
}

TZmRowContext MakeRowContext(const TRGB* palette) {
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    TZmRowContext context;
    context.palette = palette;
    context.red_coef = settings.fRedToGrayCoef;
    context.green_coef = settings.fGreenToGrayCoef;
    context.blue_coef = settings.fBlueToGrayCoef;
    context.cmyk_transform = settings.fUseCMYKProfile ? cmyk_transform.load() : nullptr;
    return context;
}

std::uint8_t GrayByCoef(TRGB rgb, const TZmRowContext& context) {
    return WeighedGray(rgb.r, rgb.g, rgb.b, context);
}

TRGB RowPixelToRGB(const std::uint8_t* row, std::int32_t x, TZmPixelFormat format,
                   const TRGB* palette) {
    if (format == zm1g) {
        const bool is_set = (row[x >> 3] >> (7 - (x & 7)) & 1) != 0;
        return is_set ? TRGB{255, 255, 255} : TRGB{};
    }
    if (format == zm8p) {
        return palette != nullptr ? palette[row[x]] : TRGB{};
    }
    const std::int32_t pixel_bytes = PixelFormatInfo(format).bit_count / 8;
    const std::uint8_t* const pixel = row + std::int64_t{x} * pixel_bytes;
    TRGB rgb;
    if (format == zm24RGB) {
        std::memcpy(&rgb, pixel, sizeof rgb);
    } else if (const TZmRowFunction convert = FindPlainRowFunction(format, zm24RGB)) {
        convert(pixel, reinterpret_cast<std::uint8_t*>(&rgb), 1,
                format == zmCMYK ? MakeRowContext(nullptr) : TZmRowContext{});
    }
    return rgb;
}

}  // namespace zm
