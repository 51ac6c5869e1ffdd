/// Fast forms of the row operations, compiled for each set of vector instructions and chosen by
/// the processor at run time. The blend operations are plain loops over bytes, since the channels
/// are treated alike; they keep to 16 bits, and the compiler makes vectors of them. Mixing by
/// alpha needs shuffles that spread one weight over three bytes, which it does not find.
///
/// What is called here is defined here, within the namespace of the instruction set: a function
/// shared with other files might be kept in the form that an older processor cannot run.

#include "engine/bitmap/zmblend_p.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "engine/bitmap/zmblend_rows.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace zm::HWY_NAMESPACE {

namespace hn = hwy::HWY_NAMESPACE;

using TWord = std::uint16_t;

constexpr TWord Word(int value) {
    return static_cast<TWord>(value);
}
constexpr TWord Smaller(TWord a, TWord b) {
    return a < b ? a : b;
}
constexpr TWord Larger(TWord a, TWord b) {
    return a > b ? a : b;
}
constexpr TWord Product(TWord a, TWord b) {
    return Word(a * b);
}
/// In this form the compiler finds the instructions for the smaller and the larger.
constexpr TWord Difference(TWord a, TWord b) {
    return Word(Larger(a, b) - Smaller(a, b));
}

/// a * b / 128 for the dark half, its mirror image for the light half.
constexpr TWord MultiplyOrScreen(TWord a, TWord b, TWord chooser) {
    const TWord dark = Word(Product(a, b) >> 7);
    const TWord light = Word(255 - (Product(Word(255 - a), Word(255 - b)) >> 7));
    return chooser >= 128 ? light : dark;
}

/// (65025 - product) / 255 of the stated quotient, the division by 255 made of shifts: exact for
/// all products of two bytes.
constexpr TWord Screen(TWord a, TWord b) {
    const TWord n = Word(65025 - Product(Word(255 - a), Word(255 - b)));
    return Word(Word(n + 1 + (n >> 8)) >> 8);
}

template <typename Operation>
void BlendBytes(const std::uint8_t* source, std::uint8_t* dest, std::size_t count,
                Operation operation) {
    for (std::size_t i = 0; i < count; ++i) {
        dest[i] = static_cast<std::uint8_t>(operation(TWord{source[i]}, TWord{dest[i]}));
    }
}

/// False for the operations that have no fast form.
bool BlendBytesBy(std::uint8_t operation, const std::uint8_t* source, std::uint8_t* dest,
                  std::size_t count) {
    const auto run = [=](auto blend) {
        BlendBytes(source, dest, count, blend);
        return true;
    };
    switch (operation) {
        case zmlNormal: return run([](TWord a, TWord) { return a; });
        case zmlAdd: return run([](TWord a, TWord b) { return Smaller(Word(a + b), 255); });
        case zmlSub: return run([](TWord a, TWord b) { return Difference(a, b); });
        case zmlMul: return run([](TWord a, TWord b) { return Word(Product(a, b) >> 8); });
        case zmlMAX: return run([](TWord a, TWord b) { return Larger(a, b); });
        case zmlMIN: return run([](TWord a, TWord b) { return Smaller(a, b); });
        case zmlAverage: return run([](TWord a, TWord b) { return Word((a + b) >> 1); });
        case zmlScreen: return run([](TWord a, TWord b) { return Screen(a, b); });
        case zmlNegation:
            return run([](TWord a, TWord b) { return Word(255 - Difference(255, Word(a + b))); });
        case zmlExclusion:
            return run([](TWord a, TWord b) { return Word(a + b - (Product(a, b) >> 7)); });
        case zmlOverlay: return run([](TWord a, TWord b) { return MultiplyOrScreen(a, b, b); });
        case zmlHardLight: return run([](TWord a, TWord b) { return MultiplyOrScreen(a, b, a); });
        default: return false;
    }
}

/// The shift drops the bits below 256 and the store those from 65536 on: a 16-bit product holds
/// all that counts.
void MixBytesEvenly(const std::uint8_t* source, std::uint8_t weight, std::uint8_t* dest,
                    std::size_t count) {
    BlendBytes(source, dest, count, [weight](TWord a, TWord b) {
        return Word(b + (Product(Word(a - b), weight) >> 8));
    });
}

#if HWY_TARGET == HWY_SCALAR

/// Without shuffles of bytes the plain loop does all.
std::int32_t MixBlocks(const std::uint8_t*, const std::uint8_t*, const TMixRule&, std::uint8_t*,
                       std::int32_t) {
    return 0;
}

#else

using TBytes = hn::CappedTag<std::uint8_t, 32>;
using TWords = hn::Repartition<std::uint16_t, TBytes>;
using TVector = hn::Vec<TBytes>;
constexpr std::int32_t kLanes = static_cast<std::int32_t>(hn::MaxLanes(TBytes()));

/// One step of the loop takes as many pixels as a vector has lanes, three vectors of bytes. The
/// weights of each of these lie within 16 bytes from a start of its own.
struct TSpread {
    std::int32_t starts[3];
    alignas(32) std::uint8_t lanes[3][kLanes];
};

constexpr TSpread MakeSpread() {
    TSpread spread{};
    for (std::int32_t i = 0; i < 3 * kLanes; ++i) {
        const std::int32_t vector = i / kLanes;
        spread.starts[vector] = vector * (kLanes - 16) / 2;
        spread.lanes[vector][i % kLanes] = static_cast<std::uint8_t>(i / 3 - spread.starts[vector]);
    }
    return spread;
}

constexpr TSpread kSpread = MakeSpread();

/// Applies a function to the 16-bit halves of byte vectors and keeps the low bytes.
template <typename Function>
HWY_INLINE TVector ByWords(Function function, TVector a, TVector b, TVector c) {
    const TBytes bytes;
    const TWords words;
    const auto zero = hn::Zero(bytes);
    const auto low = function(hn::BitCast(words, hn::InterleaveLower(bytes, a, zero)),
                              hn::BitCast(words, hn::InterleaveLower(bytes, b, zero)),
                              hn::BitCast(words, hn::InterleaveLower(bytes, c, zero)));
    const auto high = function(hn::BitCast(words, hn::InterleaveUpper(bytes, a, zero)),
                               hn::BitCast(words, hn::InterleaveUpper(bytes, b, zero)),
                               hn::BitCast(words, hn::InterleaveUpper(bytes, c, zero)));
    // Both work within blocks of 128 bits, so that the order of the lanes is kept.
    alignas(32) constexpr std::uint8_t kEven[16] = {0, 2, 4, 6, 8, 10, 12, 14,
                                                    0, 2, 4, 6, 8, 10, 12, 14};
    const auto even = hn::LoadDup128(bytes, kEven);
    const auto low_bytes = hn::TableLookupBytes(hn::BitCast(bytes, low), even);
    const auto high_bytes = hn::TableLookupBytes(hn::BitCast(bytes, high), even);
    const hn::Repartition<std::uint64_t, TBytes> quads;
    return hn::BitCast(bytes, hn::InterleaveLower(quads, hn::BitCast(quads, low_bytes),
                                                  hn::BitCast(quads, high_bytes)));
}

HWY_INLINE TVector MixVector(TVector source, TVector dest, TVector weight) {
    return ByWords(
        [](auto s, auto d, auto w)
            HWY_ATTR { return hn::Add(d, hn::ShiftRight<8>(hn::Mul(hn::Sub(s, d), w))); },
        source, dest, weight);
}

/// The weights of the alpha bytes at an address.
template <bool kHasFactor>
HWY_INLINE TVector LoadWeights(const std::uint8_t* alpha, TVector limit, hn::Vec<TWords> factor) {
    const auto limited = hn::Min(hn::LoadDup128(TBytes(), alpha), limit);
    if constexpr (!kHasFactor) {
        return limited;
    }
    return ByWords([factor](auto w, auto, auto) HWY_ATTR { return hn::MulHigh(w, factor); },
                   limited, limited, limited);
}

template <bool kHasFactor>
std::int32_t MixBlocksBy(const std::uint8_t* source, const std::uint8_t* alpha,
                         const TMixRule& rule, std::uint8_t* dest, std::int32_t width) {
    const TBytes bytes;
    const auto limit = hn::Set(bytes, rule.limit);
    const auto factor = hn::Set(TWords(), static_cast<std::uint16_t>(rule.factor_q16 & 65535));
    std::int32_t x = 0;
    for (; width - x >= kLanes; x += kLanes) {
        for (int i = 0; i < 3; ++i, source += kLanes, dest += kLanes) {
            const auto weights =
                LoadWeights<kHasFactor>(alpha + x + kSpread.starts[i], limit, factor);
            const auto spread = hn::TableLookupBytes(weights, hn::Load(bytes, kSpread.lanes[i]));
            hn::StoreU(MixVector(hn::LoadU(bytes, source), hn::LoadU(bytes, dest), spread), bytes,
                       dest);
        }
    }
    return x;
}

/// The whole vectors of a row; returns the pixels done.
std::int32_t MixBlocks(const std::uint8_t* source, const std::uint8_t* alpha, const TMixRule& rule,
                       std::uint8_t* dest, std::int32_t width) {
    return rule.factor_q16 < 65536 ? MixBlocksBy<true>(source, alpha, rule, dest, width)
                                   : MixBlocksBy<false>(source, alpha, rule, dest, width);
}

#endif

}  // namespace zm::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace zm {

HWY_EXPORT(BlendBytesBy);
HWY_EXPORT(MixBytesEvenly);
HWY_EXPORT(MixBlocks);

static const std::uint8_t* BytesOf(const TRGB* pixels) {
    return reinterpret_cast<const std::uint8_t*>(pixels);
}

static std::uint8_t* BytesOf(TRGB* pixels) {
    return reinterpret_cast<std::uint8_t*>(pixels);
}

void BlendRow(const TRGB* source, TRGB* dest, std::int32_t width, std::uint8_t operation,
              std::uint8_t row) {
    if (operation == zmlSoftLight) {
        SoftLightRow(source, dest, width);
        return;
    }
    const std::size_t count = static_cast<std::size_t>(width) * sizeof(TRGB);
    if (!HWY_DYNAMIC_DISPATCH(BlendBytesBy)(operation, BytesOf(source), BytesOf(dest), count)) {
        BlendRowPlain(source, dest, width, operation, row);
    }
}

void MixRowEvenly(const TRGB* source, std::uint8_t weight, TRGB* dest, std::int32_t width) {
    HWY_DYNAMIC_DISPATCH(MixBytesEvenly)
    (BytesOf(source), weight, BytesOf(dest), static_cast<std::size_t>(width) * sizeof(TRGB));
}

void MixRow(const TRGB* source, const std::uint8_t* alpha, const TMixRule& rule, TRGB* dest,
            std::int32_t width) {
    const std::int32_t done =
        HWY_DYNAMIC_DISPATCH(MixBlocks)(BytesOf(source), alpha, rule, BytesOf(dest), width);
    MixRowPlain(source + done, alpha + done, rule, dest + done, width - done);
}

}  // namespace zm
#endif
