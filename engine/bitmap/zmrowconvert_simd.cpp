/// Row conversions in vectors, compiled once for each instruction set that the library knows and
/// chosen at run time. Every function here is the twin of a plain one and gives its bytes; what
/// is left of a row behind the last whole step goes to the plain one.
///
/// Conversions that only move bytes work in blocks of 16, in which any byte can move anywhere:
/// they wait for memory, and wider stores would straddle its lines. Those that compute use the
/// widest vectors there are. Two of them, a palette and a grey, are much faster where the processor
/// moves bytes freely through all of a 64-byte vector (VBMI); these use the compiler's own names of
/// the instructions, for which the library has none.

#define HWY_WANT_AVX3_DL  // the set with VBMI, which the library leaves out unless asked

#include "engine/bitmap/zmrowconvert_fast_p.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "engine/bitmap/zmrowconvert_simd.cpp"
#include <hwy/cache_control.h>
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

#ifndef ZM_ROWCONVERT_SIMD_ONCE
#define ZM_ROWCONVERT_SIMD_ONCE

namespace zm {
namespace {

/// What one instruction set offers; nil members fall back to the plain functions.
struct TFastRows {
    TZmRowFunction to_gray = nullptr;     // zm24RGB to zm8g
    TZmRowFunction add_alpha = nullptr;   // zm24RGB to zm32RGB
    TZmRowFunction drop_alpha = nullptr;  // zm32RGB to zm24RGB
    TZmRowFunction to_words = nullptr;    // zm24RGB to zm48RGB
    TZmRowFunction from_words = nullptr;  // zm48RGB to zm24RGB
    TZmRowFunction gray_to_24 = nullptr;  // zm8g to zm24RGB
    TZmRowFunction gray_to_32 = nullptr;  // zm8g to zm32RGB
    TZmRowFunction palette = nullptr;     // zm8p to zm24RGB
    // Past the caches.
    TZmRowFunction stream_alpha = nullptr;          // zm24RGB to zm32RGB
    TZmRowFunction stream_without_alpha = nullptr;  // zm32RGB to zm24RGB
    TZmRowFunction stream_gray_to_32 = nullptr;     // zm8g to zm32RGB
    TZmBitsAboveFunction bits_above = nullptr;
};

// A grey sum below 65536 over 100 is a product's high half: (sum / 4) * 5243 / 2^17. The check
// runs over every such sum.

constexpr std::uint32_t kPerHundredFactor = 5243;

constexpr bool QuotientsAreExact() {
    for (std::uint32_t sum = 0; sum < 65536; ++sum) {
        if (((sum >> 2) * kPerHundredFactor >> 16 >> 1) != sum / 100) {
            return false;
        }
    }
    return true;
}
static_assert(QuotientsAreExact());

/// Weights whose sums stay below 65536 for all colours.
bool SumsFitWords(const TZmRowContext& context) {
    constexpr std::int32_t kLargest = 257;
    const auto fits = [](std::int32_t coef) { return coef >= 0 && coef <= kLargest; };
    return fits(context.red_coef) && fits(context.green_coef) && fits(context.blue_coef) &&
           context.red_coef + context.green_coef + context.blue_coef <= kLargest;
}

}  // namespace
}  // namespace zm

#endif  // ZM_ROWCONVERT_SIMD_ONCE

HWY_BEFORE_NAMESPACE();
namespace zm {
namespace {
namespace HWY_NAMESPACE {

#if HWY_TARGET == HWY_SCALAR || HWY_TARGET == HWY_EMU128

// Without byte shuffles the plain loops are the best there is.
TFastRows GetFastRows() {
    return {};
}

#else

namespace hn = hwy::HWY_NAMESPACE;

constexpr std::size_t kBytes = HWY_LANES(std::uint8_t);
constexpr std::size_t kBlockBytes = 16;
constexpr auto kStep = static_cast<std::int32_t>(kBytes);

using TBytes = hn::ScalableTag<std::uint8_t>;
using THalfWords = hn::ScalableTag<std::uint16_t>;
using TVector = hn::Vec<TBytes>;
using TBlockBytes = hn::CappedTag<std::uint8_t, kBlockBytes>;
using TBlockWords = hn::CappedTag<std::uint32_t, 4>;
using TBlock = hn::Vec<TBlockBytes>;

/// One block of a widening conversion: a load from `offset` bytes behind the step's start, of
/// which byte `bytes[i]` becomes byte i.
struct TWideningBlock {
    std::size_t offset = 0;
    std::uint8_t bytes[kBlockBytes] = {};
};

/// One step of a widening conversion: the fewest blocks that hold whole pixels.
template <typename Map>
struct TWideningStep {
    static constexpr std::size_t kBlocks = Map::kDestBytes % 3 == 0 ? 3 : 1;
    static constexpr auto kPixels =
        static_cast<std::int32_t>(kBlocks * kBlockBytes / Map::kDestBytes);

    TWideningBlock blocks[kBlocks];
    std::int32_t pixels_read = 0;  // what the loads of a step reach over
    bool is_sound = true;          // each block finds its bytes in its load

    constexpr TWideningStep() : blocks() {
        for (std::size_t block = 0; block < kBlocks; ++block) {
            PlanBlock(blocks[block], block * kBlockBytes);
        }
    }

private:
    constexpr void PlanBlock(TWideningBlock& block, std::size_t first) {
        block.offset = Map::SourceOf(first);
        for (std::size_t i = 0; i < kBlockBytes; ++i) {
            const std::size_t from = Map::SourceOf(first + i);
            block.offset = from < block.offset ? from : block.offset;
        }
        for (std::size_t i = 0; i < kBlockBytes; ++i) {
            const std::size_t from = Map::SourceOf(first + i) - block.offset;
            block.bytes[i] = static_cast<std::uint8_t>(from);
            is_sound = is_sound && from < kBlockBytes;
        }
        const std::size_t end = block.offset + kBlockBytes;
        const auto pixels =
            static_cast<std::int32_t>((end + Map::kSourceBytes - 1) / Map::kSourceBytes);
        pixels_read = pixels > pixels_read ? pixels : pixels_read;
    }
};

struct TColorTo32 {
    static constexpr std::size_t kSourceBytes = 3;
    static constexpr std::size_t kDestBytes = 4;
    /// The alpha byte takes any byte: its bits are set afterwards.
    static constexpr std::size_t SourceOf(std::size_t i) { return i / 4 * 3 + (i % 4) % 3; }
};
struct TColorTo48 {
    static constexpr std::size_t kSourceBytes = 3;
    static constexpr std::size_t kDestBytes = 6;
    static constexpr std::size_t SourceOf(std::size_t i) { return i / 6 * 3 + 2 - i % 6 / 2; }
};
struct TGrayTo24 {
    static constexpr std::size_t kSourceBytes = 1;
    static constexpr std::size_t kDestBytes = 3;
    static constexpr std::size_t SourceOf(std::size_t i) { return i / 3; }
};
struct TGrayTo32 {
    static constexpr std::size_t kSourceBytes = 1;
    static constexpr std::size_t kDestBytes = 4;
    static constexpr std::size_t SourceOf(std::size_t i) { return i / 4; }
};

/// `kSetBits` are set in every four bytes: the alpha, or nothing.
template <typename Map, TZmPixelFormat kFrom, TZmPixelFormat kTo, std::uint32_t kSetBits>
void WidenRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
              const TZmRowContext& context) {
    using TStep = TWideningStep<Map>;
    static constexpr TStep kPlan;
    static_assert(kPlan.is_sound);
    constexpr std::int32_t kNeeded =
        kPlan.pixels_read > TStep::kPixels ? kPlan.pixels_read : TStep::kPixels;
    const TBlockBytes bytes;
    const TBlock set = hn::BitCast(bytes, hn::Set(TBlockWords(), kSetBits));
    std::int32_t left = width;
    for (; left >= kNeeded; left -= TStep::kPixels) {
        for (std::size_t i = 0; i < TStep::kBlocks; ++i) {
            const TWideningBlock& block = kPlan.blocks[i];
            const TBlock moved = hn::TableLookupBytes(hn::LoadU(bytes, source + block.offset),
                                                      hn::LoadU(bytes, block.bytes));
            hn::StoreU(hn::Or(moved, set), bytes, dest + i * kBlockBytes);
        }
        source += TStep::kPixels * Map::kSourceBytes;
        dest += TStep::kBlocks * kBlockBytes;
    }
    FindPlainRowFunction(kFrom, kTo)(source, dest, left, context);
}

/// Asks for what is read soon. The processor does so itself, but not beyond the page that it is in.
HWY_INLINE void Prefetch(const std::uint8_t* source) {
    constexpr std::uintptr_t kAheadBytes = 4096;
    const std::uintptr_t address = reinterpret_cast<std::uintptr_t>(source) + kAheadBytes;
    hwy::Prefetch(reinterpret_cast<const std::uint8_t*>(address));  // any address may be asked for
}

using TBlockHalves = hn::CappedTag<std::uint8_t, 2 * kBlockBytes>;
using TBlockLines = hn::CappedTag<std::uint8_t, 4 * kBlockBytes>;

/// Stores four blocks past the caches; `dest` is the start of a line of 64 bytes. Halves of a line
/// would hold up the reading between them.
HWY_INLINE void StreamLine(TBlock a, TBlock b, TBlock c, TBlock d, std::uint8_t* dest) {
#if HWY_MAX_BYTES >= 64
    const TBlockHalves half;
    hn::Stream(hn::Combine(TBlockLines(), hn::Combine(half, d, c), hn::Combine(half, b, a)),
               TBlockLines(), dest);
#elif HWY_MAX_BYTES >= 32
    const TBlockHalves half;
    hn::Stream(hn::Combine(half, b, a), half, dest);
    hn::Stream(hn::Combine(half, d, c), half, dest + 2 * kBlockBytes);
#else
    const TBlockBytes bytes;
    hn::Stream(a, bytes, dest);
    hn::Stream(b, bytes, dest + kBlockBytes);
    hn::Stream(c, bytes, dest + 2 * kBlockBytes);
    hn::Stream(d, bytes, dest + 3 * kBlockBytes);
#endif
}

/// WidenRow to pixels of four bytes, in lines that go past the caches.
template <typename Map, TZmPixelFormat kFrom, TZmPixelFormat kTo, std::uint32_t kSetBits>
void StreamRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    static_assert(Map::kDestBytes == 4);
    constexpr std::size_t kLineBytes = 4 * kBlockBytes;
    constexpr auto kLinePixels = static_cast<std::int32_t>(kLineBytes / Map::kDestBytes);
    constexpr std::size_t kBlockSource = 4 * Map::kSourceBytes;
    constexpr auto kNeeded = static_cast<std::int32_t>(
        (3 * kBlockSource + kBlockBytes + Map::kSourceBytes - 1) / Map::kSourceBytes);
    static constexpr TWideningStep<Map> kPlan;
    static_assert(kPlan.is_sound && TWideningStep<Map>::kBlocks == 1 &&
                  kPlan.blocks[0].offset == 0);
    const TBlockBytes bytes;
    const TBlock set = hn::BitCast(bytes, hn::Set(TBlockWords(), kSetBits));
    const TBlock order = hn::LoadU(bytes, kPlan.blocks[0].bytes);
    const auto widen = [=](const std::uint8_t* pixels) HWY_ATTR {
        return hn::Or(hn::TableLookupBytes(hn::LoadU(bytes, pixels), order), set);
    };
    const std::size_t before = (0 - reinterpret_cast<std::uintptr_t>(dest)) % kLineBytes;
    const bool can_align = before % Map::kDestBytes == 0;
    const auto head = static_cast<std::int32_t>(before / Map::kDestBytes);
    std::int32_t left = width;
    if (can_align && head < left) {
        WidenRow<Map, kFrom, kTo, kSetBits>(source, dest, head, context);
        source += static_cast<std::size_t>(head) * Map::kSourceBytes;
        dest += before;
        left -= head;
        for (; left >= kNeeded; left -= kLinePixels, dest += kLineBytes) {
            Prefetch(source);
            StreamLine(widen(source), widen(source + kBlockSource),
                       widen(source + 2 * kBlockSource), widen(source + 3 * kBlockSource), dest);
            source += 4 * kBlockSource;
        }
    }
    WidenRow<Map, kFrom, kTo, kSetBits>(source, dest, left, context);
}

// The narrowing loops store whole blocks of which the last bytes are written again by the next
// step, or by the plain function; they end before such a store would leave the row.
constexpr std::int32_t kPixelsInABlock = 6;  // touched by 16 bytes of zm24RGB

/// The first three of every four bytes, in front.
alignas(kBlockBytes) constexpr std::uint8_t kFirstThree[kBlockBytes] = {
    0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, 0x80, 0x80, 0x80, 0x80};

/// Sixteen pixels without their alpha in three blocks.
HWY_INLINE void PackColors(const std::uint8_t* source, TBlock* colors) {
    const TBlockBytes bytes;
    const TBlock first_three = hn::Load(bytes, kFirstThree);
    const auto four_pixels = [=](std::size_t offset) HWY_ATTR {
        return hn::TableLookupBytesOr0(hn::LoadU(bytes, source + offset), first_three);
    };
    const TBlock second = four_pixels(kBlockBytes);
    const TBlock third = four_pixels(2 * kBlockBytes);
    colors[0] = hn::Or(four_pixels(0), hn::ShiftLeftBytes<12>(bytes, second));
    colors[1] = hn::Or(hn::ShiftRightBytes<4>(bytes, second), hn::ShiftLeftBytes<8>(bytes, third));
    colors[2] = hn::Or(hn::ShiftRightBytes<8>(bytes, third),
                       hn::ShiftLeftBytes<4>(bytes, four_pixels(3 * kBlockBytes)));
}

void DropAlphaRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                  const TZmRowContext& context) {
    const TBlockBytes bytes;
    std::int32_t left = width;
    for (; left >= 16; left -= 16, source += 64, dest += 48) {
        TBlock colors[3];
        PackColors(source, colors);
        hn::StoreU(colors[0], bytes, dest);
        hn::StoreU(colors[1], bytes, dest + kBlockBytes);
        hn::StoreU(colors[2], bytes, dest + 2 * kBlockBytes);
    }
    const TBlock first_three = hn::Load(bytes, kFirstThree);
    for (; left >= kPixelsInABlock; left -= 4, source += 16, dest += 12) {
        const TBlock colors = hn::TableLookupBytesOr0(hn::LoadU(bytes, source), first_three);
        hn::StoreU(colors, bytes, dest);
    }
    FindPlainRowFunction(zm32RGB, zm24RGB)(source, dest, left, context);
}

/// DropAlphaRow in lines that go past the caches, three lines of 64 pixels at a time.
void StreamWithoutAlpha(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                        const TZmRowContext& context) {
    constexpr std::int32_t kPixels = 64;
    constexpr std::size_t kInverseOfThree = 43;  // modulo 64
    const auto head = static_cast<std::int32_t>((0 - reinterpret_cast<std::uintptr_t>(dest)) *
                                                kInverseOfThree % kPixels);
    std::int32_t left = width;
    if (head < left) {
        DropAlphaRow(source, dest, head, context);
        source += std::ptrdiff_t{head} * 4;
        dest += std::ptrdiff_t{head} * 3;
        left -= head;
        for (; left >= kPixels; left -= kPixels, source += 4 * kPixels, dest += 3 * kPixels) {
            TBlock colors[12];
            for (std::size_t i = 0; i < 4; ++i) {
                Prefetch(source + 4 * kBlockBytes * i);
                PackColors(source + 4 * kBlockBytes * i, colors + 3 * i);
            }
            for (std::size_t i = 0; i < 3; ++i) {
                const TBlock* const line = colors + 4 * i;
                StreamLine(line[0], line[1], line[2], line[3], dest + 4 * kBlockBytes * i);
            }
        }
    }
    DropAlphaRow(source, dest, left, context);
}

/// Five pixels at a time: the high bytes of words 0 to 7, and of words 7 to 14, red first.
void FromWordsRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                  const TZmRowContext& context) {
    alignas(kBlockBytes) static constexpr std::uint8_t kLow[kBlockBytes] = {
        5, 3, 1, 11, 9, 7, 0x80, 15, 13, 0x80, 0x80, 0x80, 0x80, 0x80, 0x80, 0x80};
    alignas(kBlockBytes) static constexpr std::uint8_t kHigh[kBlockBytes] = {
        0x80, 0x80, 0x80, 0x80, 0x80, 0x80, 3, 0x80, 0x80, 9, 7, 5, 15, 13, 11, 0x80};
    const TBlockBytes bytes;
    const TBlock low = hn::Load(bytes, kLow);
    const TBlock high = hn::Load(bytes, kHigh);
    std::int32_t left = width;
    for (; left >= kPixelsInABlock; left -= 5, source += 30, dest += 15) {
        const TBlock first = hn::TableLookupBytesOr0(hn::LoadU(bytes, source), low);
        const TBlock second = hn::TableLookupBytesOr0(hn::LoadU(bytes, source + 14), high);
        hn::StoreU(hn::Or(first, second), bytes, dest);
    }
    FindPlainRowFunction(zm48RGB, zm24RGB)(source, dest, left, context);
}

using THalfWordVector = hn::Vec<THalfWords>;

/// Grey of colours whose channels lie in half words.
HWY_INLINE THalfWordVector GrayOf(THalfWordVector blue, THalfWordVector green, THalfWordVector red,
                                  const TZmRowContext& context) {
    const THalfWords half_words;
    const auto weigh = [half_words](THalfWordVector channel, std::int32_t coef) HWY_ATTR {
        return hn::Mul(channel, hn::Set(half_words, static_cast<std::uint16_t>(coef)));
    };
    const THalfWordVector sum =
        hn::Add(hn::Add(weigh(blue, context.blue_coef), weigh(green, context.green_coef)),
                weigh(red, context.red_coef));
    const THalfWordVector factor =
        hn::Set(half_words, static_cast<std::uint16_t>(kPerHundredFactor));
    return hn::ShiftRight<1>(hn::MulHigh(hn::ShiftRight<2>(sum), factor));
}

void ToGrayRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
               const TZmRowContext& context) {
    const TBytes bytes;
    const THalfWords half_words;
    const THalfWordVector low_byte = hn::Set(half_words, std::uint16_t{255});
    const auto even = [=](TVector vector)
                          HWY_ATTR { return hn::And(hn::BitCast(half_words, vector), low_byte); };
    const auto odd = [=](TVector vector)
                         HWY_ATTR { return hn::ShiftRight<8>(hn::BitCast(half_words, vector)); };
    std::int32_t left = width;
    for (; left >= kStep && SumsFitWords(context); left -= kStep) {
        TVector blue;
        TVector green;
        TVector red;
        hn::LoadInterleaved3(bytes, source, blue, green, red);
        const THalfWordVector even_gray = GrayOf(even(blue), even(green), even(red), context);
        const THalfWordVector odd_gray = GrayOf(odd(blue), odd(green), odd(red), context);
        const THalfWordVector gray =
            hn::Or(hn::And(even_gray, low_byte), hn::ShiftLeft<8>(odd_gray));
        hn::StoreU(hn::BitCast(bytes, gray), bytes, dest);
        source += 3 * kBytes;
        dest += kBytes;
    }
    FindPlainRowFunction(zm24RGB, zm8g)(source, dest, left, context);
}

#if HWY_TARGET == HWY_AVX3_DL

constexpr std::size_t kColors = 256;
constexpr std::int32_t kStepsWorthATable = 4;

/// Where the bytes of three vectors of channels go in three of colours: byte i of colours[k] is
/// byte `lanes[k][i]` of blue and green one after the other, or, where `is_red`, of red.
struct TInterleaving {
    std::uint8_t lanes[3][64] = {};
    std::uint64_t is_red[3] = {};

    constexpr TInterleaving() {
        for (std::size_t i = 0; i < 3 * 64; ++i) {
            const std::size_t channel = i % 3;
            lanes[i / 64][i % 64] = static_cast<std::uint8_t>(i / 3 + (channel == 1 ? 64 : 0));
            is_red[i / 64] |= std::uint64_t{channel == 2} << i % 64;
        }
    }
};
constexpr TInterleaving kInterleaving;

/// One channel of a palette, 256 bytes.
struct TChannelTable {
    __m512i quarters[4];

    HWY_INLINE __m512i Find(__m512i indexes) const {
        const __m512i low = _mm512_permutex2var_epi8(quarters[0], indexes, quarters[1]);
        const __m512i high = _mm512_permutex2var_epi8(quarters[2], indexes, quarters[3]);
        return _mm512_mask_blend_epi8(_mm512_movepi8_mask(indexes), low, high);
    }
};

void PaletteRow(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                const TZmRowContext& context) {
    if (width < kStepsWorthATable * kStep) {
        Row8pTo24Fast(source, dest, width, context);
        return;
    }
    TChannelTable tables[3];
    const auto* const palette = reinterpret_cast<const std::uint8_t*>(context.palette);
    for (std::size_t i = 0; i < kColors / kBytes; ++i) {
        TVector channels[3];
        hn::LoadInterleaved3(TBytes(), palette + 3 * kBytes * i, channels[0], channels[1],
                             channels[2]);
        for (std::size_t channel = 0; channel < 3; ++channel) {
            tables[channel].quarters[i] = channels[channel].raw;
        }
    }
    std::int32_t left = width;
    for (; left >= kStep; left -= kStep, source += kBytes) {
        const __m512i indexes = _mm512_loadu_si512(source);
        const __m512i blue = tables[0].Find(indexes);
        const __m512i green = tables[1].Find(indexes);
        const __m512i red = tables[2].Find(indexes);
        for (std::size_t i = 0; i < 3; ++i, dest += kBytes) {
            const __m512i lanes = _mm512_loadu_si512(kInterleaving.lanes[i]);
            const __m512i two = _mm512_permutex2var_epi8(blue, lanes, green);
            _mm512_storeu_si512(
                dest, _mm512_mask_permutexvar_epi8(two, kInterleaving.is_red[i], lanes, red));
        }
    }
    Row8pTo24Fast(source, dest, left, context);
}

/// Sixteen colours spread to four bytes each, the fourth one of no weight.
struct TSpreadColors {
    std::uint8_t lanes[64] = {};

    constexpr TSpreadColors() {
        for (std::size_t i = 0; i < 64; ++i) {
            lanes[i] = static_cast<std::uint8_t>(i / 4 * 3 + i % 4 % 3);
        }
    }
};
constexpr TSpreadColors kSpreadColors;

/// What two packings within blocks of 16 bytes do to the order of four bytes each.
struct TUnpackedOrder {
    std::uint32_t lanes[16] = {};

    constexpr TUnpackedOrder() {
        for (std::uint32_t i = 0; i < 16; ++i) {
            lanes[i] = i % 4 * 4 + i / 4;
        }
    }
};
constexpr TUnpackedOrder kUnpackedOrder;

/// Weights of at most a whole: they fit signed bytes, and no grey is above 255.
bool AreAtMostAWhole(const TZmRowContext& context) {
    return SumsFitWords(context) &&
           context.red_coef + context.green_coef + context.blue_coef <= 100;
}

/// Grey of 64 colours from 208 readable bytes.
HWY_INLINE __m512i GrayOfColors(const std::uint8_t* colors, __m512i weights) {
    const __m512i lanes = _mm512_loadu_si512(kSpreadColors.lanes);
    const __m512i ones = _mm512_set1_epi16(1);
    const auto sums_of = [=](const std::uint8_t* sixteen) HWY_ATTR {
        const __m512i spread = _mm512_permutexvar_epi8(lanes, _mm512_loadu_si512(sixteen));
        return _mm512_madd_epi16(_mm512_maddubs_epi16(spread, weights), ones);
    };
    const auto per_hundred = [](__m512i sums) HWY_ATTR {
        const __m512i factor = _mm512_set1_epi16(static_cast<short>(kPerHundredFactor));
        return _mm512_srli_epi16(_mm512_mulhi_epu16(_mm512_srli_epi16(sums, 2), factor), 1);
    };
    const __m512i low = _mm512_packus_epi32(sums_of(colors), sums_of(colors + 48));
    const __m512i high = _mm512_packus_epi32(sums_of(colors + 96), sums_of(colors + 144));
    const __m512i gray = _mm512_packus_epi16(per_hundred(low), per_hundred(high));
    return _mm512_permutexvar_epi32(_mm512_loadu_si512(kUnpackedOrder.lanes), gray);
}

void ToGrayRowByBytes(const std::uint8_t* source, std::uint8_t* dest, std::int32_t width,
                      const TZmRowContext& context) {
    constexpr std::int32_t kNeeded = (144 + 64 + 2) / 3;  // pixels that a step's loads reach over
    std::int32_t left = AreAtMostAWhole(context) ? width : 0;
    const __m512i weights =
        _mm512_set1_epi32(context.blue_coef | context.green_coef << 8 | context.red_coef << 16);
    const std::int32_t rest = width - left;
    for (; left >= kNeeded; left -= kStep, source += 3 * kBytes, dest += kBytes) {
        _mm512_storeu_si512(dest, GrayOfColors(source, weights));
    }
    ToGrayRow(source, dest, left + rest, context);
}

#endif  // HWY_AVX3_DL

/// Eight pixels in the order of a byte's bits, whose lowest is the rightmost.
struct TReversedEights {
    std::uint8_t bytes[kBytes] = {};

    constexpr TReversedEights() {
        for (std::size_t i = 0; i < kBytes; ++i) {
            bytes[i] = static_cast<std::uint8_t>(i % kBlockBytes ^ 7u);
        }
    }
};
constexpr TReversedEights kReversedEights;

std::int32_t BitsAbove(const std::uint8_t* gray, std::uint8_t* dest, std::int32_t width,
                       const std::uint8_t* levels) {
    const TBytes bytes;
    const TVector reverse = hn::LoadU(bytes, kReversedEights.bytes);
    std::uint8_t pattern[kBytes];
    for (std::size_t i = 0; i < kBytes; ++i) {
        pattern[i] = levels[i % 8];
    }
    const TVector reversed_levels = hn::TableLookupBytes(hn::LoadU(bytes, pattern), reverse);
    std::int32_t x = 0;
    for (; width - x >= kStep; x += kStep) {
        const TVector pixels = hn::TableLookupBytes(hn::LoadU(bytes, gray + x), reverse);
        std::uint8_t bits[8] = {};
        hn::StoreMaskBits(bytes, hn::Gt(pixels, reversed_levels), bits);
        hwy::CopyBytes<kBytes / 8>(bits, dest + x / 8);
    }
    return x;
}

TFastRows GetFastRows() {
    TFastRows rows;
    rows.to_gray = ToGrayRow;
    rows.add_alpha = WidenRow<TColorTo32, zm24RGB, zm32RGB, 0xFF000000u>;
    rows.drop_alpha = DropAlphaRow;
    rows.to_words = WidenRow<TColorTo48, zm24RGB, zm48RGB, 0>;
    rows.from_words = FromWordsRow;
    rows.gray_to_24 = WidenRow<TGrayTo24, zm8g, zm24RGB, 0>;
    rows.gray_to_32 = WidenRow<TGrayTo32, zm8g, zm32RGB, 0xFF000000u>;
    rows.stream_alpha = StreamRow<TColorTo32, zm24RGB, zm32RGB, 0xFF000000u>;
    rows.stream_without_alpha = StreamWithoutAlpha;
    rows.stream_gray_to_32 = StreamRow<TGrayTo32, zm8g, zm32RGB, 0xFF000000u>;
    rows.bits_above = BitsAbove;
#if HWY_TARGET == HWY_AVX3_DL
    rows.to_gray = ToGrayRowByBytes;
    rows.palette = PaletteRow;
#endif
    return rows;
}

#endif  // byte shuffles

}  // namespace HWY_NAMESPACE
}  // namespace
}  // namespace zm
HWY_AFTER_NAMESPACE();

#if HWY_ONCE

namespace zm {
namespace {
HWY_EXPORT(GetFastRows);
}  // namespace

TZmRowFunction FindFastRowFunction(TZmPixelFormat from, TZmPixelFormat to) {
    const TFastRows rows = HWY_DYNAMIC_DISPATCH(GetFastRows)();
    switch (from << 4 | to) {
        case zm24RGB << 4 | zm8g: return rows.to_gray;
        case zm24RGB << 4 | zm32RGB: return rows.add_alpha;
        case zm24RGB << 4 | zm48RGB: return rows.to_words;
        case zm32RGB << 4 | zm24RGB: return rows.drop_alpha;
        case zm48RGB << 4 | zm24RGB: return rows.from_words;
        case zm8p << 4 | zm24RGB: return rows.palette != nullptr ? rows.palette : Row8pTo24Fast;
        case zm8g << 4 | zm24RGB: return rows.gray_to_24;
        case zm8g << 4 | zm32RGB: return rows.gray_to_32;
        default: return nullptr;
    }
}

TZmRowFunction FindStreamingRowFunction(TZmPixelFormat from, TZmPixelFormat to) {
    const TFastRows rows = HWY_DYNAMIC_DISPATCH(GetFastRows)();
    switch (from << 4 | to) {
        case zm24RGB << 4 | zm32RGB: return rows.stream_alpha;
        case zm32RGB << 4 | zm24RGB: return rows.stream_without_alpha;
        case zm8g << 4 | zm32RGB: return rows.stream_gray_to_32;
        default: return nullptr;
    }
}

TZmBitsAboveFunction FindFastBitsAbove() {
    return HWY_DYNAMIC_DISPATCH(GetFastRows)().bits_above;
}

}  // namespace zm

#endif  // HWY_ONCE
