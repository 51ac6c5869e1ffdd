/// Fast row conversions against the plain ones: the same bytes for every instruction set that
/// this processor has, and no byte read or written outside the rows.

#include <gtest/gtest.h>
#include <hwy/targets.h>

#include <cstdint>
#include <cstring>
#include <vector>

#include "engine/bitmap/zmonebit_p.h"
#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmrowconvert_fast_p.h"
#include "tests/support/instructionsets.h"

namespace zm::test {
namespace {

constexpr std::uint8_t kGuard = 0xA5;
constexpr std::size_t kGuardBytes = 80;  // more than a vector

std::vector<std::uint8_t> Noise(std::size_t count, std::uint32_t seed) {
    std::vector<std::uint8_t> bytes(count);
    for (std::uint8_t& byte : bytes) {
        seed = seed * 1664525u + 1013904223u;
        byte = static_cast<std::uint8_t>(seed >> 24);
    }
    return bytes;
}

struct TPair {
    TZmPixelFormat from;
    TZmPixelFormat to;
};
constexpr TPair kFastPairs[] = {
    {zm24RGB, zm8g},    {zm24RGB, zm32RGB}, {zm24RGB, zm48RGB}, {zm32RGB, zm24RGB},
    {zm48RGB, zm24RGB}, {zm8g, zm24RGB},    {zm8g, zm32RGB},    {zm8p, zm24RGB},
};

std::size_t RowBytes(TZmPixelFormat format, std::int32_t width) {
    return static_cast<std::size_t>(width) *
           static_cast<std::size_t>(PixelFormatInfo(format).bit_count) / 8;
}

/// Converts one row both ways. The source lies at the very end of its block, `shift` bytes off
/// its start, the target between guards, `shift` bytes off an even address.
void ExpectSameRow(const TPair& pair, std::int32_t width, std::size_t shift,
                   const TZmRowContext& context, TZmRowFunction convert = nullptr) {
    const std::vector<std::uint8_t> source =
        Noise(shift + RowBytes(pair.from, width), static_cast<std::uint32_t>(width) + 7);
    const std::size_t dest_bytes = RowBytes(pair.to, width);
    const std::size_t begin = kGuardBytes + shift;
    std::vector<std::uint8_t> expected(begin + dest_bytes + kGuardBytes, kGuard);
    std::vector<std::uint8_t> actual = expected;
    FindPlainRowFunction(pair.from, pair.to)(source.data() + shift, expected.data() + begin, width,
                                             context);
    convert = convert != nullptr ? convert : FindRowFunction(pair.from, pair.to);
    convert(source.data() + shift, actual.data() + begin, width, context);
    for (std::size_t i = 0; i < expected.size(); ++i) {
        ASSERT_EQ(expected[i], actual[i])
            << PixelFormatInfo(pair.from).name << " to " << PixelFormatInfo(pair.to).name
            << ", width " << width << ", shift " << shift << ", byte "
            << static_cast<std::ptrdiff_t>(i) - static_cast<std::ptrdiff_t>(begin);
    }
}

std::vector<TRGB> NoisePalette() {
    const std::vector<std::uint8_t> bytes = Noise(768, 99);
    std::vector<TRGB> palette(256);
    std::memcpy(static_cast<void*>(palette.data()), bytes.data(), bytes.size());
    return palette;
}

TEST(FastRows, GiveTheBytesOfThePlainOnes) {
    const std::vector<TRGB> palette = NoisePalette();
    TZmRowContext context;
    context.palette = palette.data();
    ForEachInstructionSet([&] {
        for (const TPair& pair : kFastPairs) {
            for (std::int32_t width = 0; width <= 70; ++width) {
                for (std::size_t shift = 0; shift < 4; ++shift) {
                    ASSERT_NO_FATAL_FAILURE(ExpectSameRow(pair, width, shift, context));
                }
            }
            for (const std::int32_t width : {127, 128, 129, 191, 255, 256, 257, 1001}) {
                ASSERT_NO_FATAL_FAILURE(ExpectSameRow(pair, width, 1, context));
            }
        }
    });
}

TEST(FastRows, GoPastTheCachesWithTheSameBytes) {
    constexpr TPair kPairs[] = {{zm24RGB, zm32RGB}, {zm32RGB, zm24RGB}, {zm8g, zm32RGB}};
    ForEachInstructionSet([&] {
        for (const TPair& pair : kPairs) {
            const TZmRowFunction stream = FindStreamingRowFunction(pair.from, pair.to);
            for (const std::int32_t width :
                 {0, 1, 15, 16, 17, 18, 28, 33, 63, 64, 65, 90, 127, 128, 129, 192, 193, 300}) {
                for (std::size_t shift = 0; stream != nullptr && shift < 64; ++shift) {
                    ASSERT_NO_FATAL_FAILURE(ExpectSameRow(pair, width, shift, {}, stream));
                }
            }
        }
    });
}

TEST(FastRows, AreChosenByWhatTheProcessorHas) {
    const std::int64_t targets = hwy::SupportedTargets();
    const bool has_avx2 = __builtin_cpu_supports("avx2") != 0 &&
                          __builtin_cpu_supports("fma") != 0 && __builtin_cpu_supports("bmi2") != 0;
    const bool has_avx512 = has_avx2 && __builtin_cpu_supports("avx512bw") != 0 &&
                            __builtin_cpu_supports("avx512vl") != 0 &&
                            __builtin_cpu_supports("avx512dq") != 0;
    EXPECT_EQ((targets & HWY_SSSE3) != 0, __builtin_cpu_supports("ssse3") != 0);
    EXPECT_EQ((targets & HWY_AVX2) != 0, has_avx2);
    EXPECT_EQ((targets & HWY_AVX3) != 0, has_avx512);
    if (__builtin_cpu_supports("avx512vbmi") == 0) {
        EXPECT_EQ(targets & HWY_AVX3_DL, 0);
    }
}

TEST(FastRows, AreThereWhereTheProcessorHasByteShuffles) {
    if ((hwy::SupportedTargets() & (HWY_SSSE3 | HWY_SSE4 | HWY_AVX2 | HWY_AVX3)) == 0) {
        GTEST_SKIP() << "this processor has none of the instruction sets";
    }
    for (const TPair& pair : kFastPairs) {
        EXPECT_NE(FindRowFunction(pair.from, pair.to), FindPlainRowFunction(pair.from, pair.to))
            << PixelFormatInfo(pair.from).name << " to " << PixelFormatInfo(pair.to).name;
    }
    EXPECT_NE(FindFastBitsAbove(), nullptr);
}

TEST(FastGray, FollowsEveryWeight) {
    // Sums up to 65535 take the fast way, others the plain one; past 255 the low byte is kept.
    constexpr std::int32_t kWeights[][3] = {
        {21, 71, 8},  {100, 0, 0}, {0, 0, 100},  {0, 257, 0}, {257, 0, 0},  {85, 86, 86},
        {86, 86, 86}, {0, 0, 0},   {30, 59, 11}, {258, 0, 0}, {-1, 101, 0}, {70000, 3, 3},
    };
    ForEachInstructionSet([&] {
        for (const auto& weights : kWeights) {
            TZmRowContext context;
            context.red_coef = weights[0];
            context.green_coef = weights[1];
            context.blue_coef = weights[2];
            SCOPED_TRACE(::testing::Message()
                         << weights[0] << " " << weights[1] << " " << weights[2]);
            ASSERT_NO_FATAL_FAILURE(ExpectSameRow({zm24RGB, zm8g}, 3001, 1, context));
        }
    });
}

TEST(FastGray, OfAllReds_AllGreensAndEveryThirdBlue) {
    std::vector<std::uint8_t> row;
    std::vector<std::uint8_t> expected(256 * 86);
    std::vector<std::uint8_t> actual(expected.size());
    const auto width = static_cast<std::int32_t>(expected.size());
    const TZmRowContext context;
    for (int red = 0; red < 256; ++red) {
        row.clear();
        for (int green = 0; green < 256; ++green) {
            for (int blue = 0; blue < 256; blue += 3) {
                row.push_back(static_cast<std::uint8_t>(blue));
                row.push_back(static_cast<std::uint8_t>(green));
                row.push_back(static_cast<std::uint8_t>(red));
            }
        }
        FindPlainRowFunction(zm24RGB, zm8g)(row.data(), expected.data(), width, context);
        ForEachInstructionSet([&] {
            FindRowFunction(zm24RGB, zm8g)(row.data(), actual.data(), width, context);
            ASSERT_EQ(expected, actual) << "red " << red;
        });
    }
}

using TBitRow = void (*)(const std::uint8_t*, std::uint8_t*, std::int32_t, std::int32_t);

void ExpectSameBits(TBitRow plain, TBitRow fast, std::int32_t width, std::size_t shift,
                    std::int32_t argument) {
    const std::vector<std::uint8_t> gray =
        Noise(shift + static_cast<std::size_t>(width), static_cast<std::uint32_t>(width) + 3);
    std::vector<std::uint8_t> expected(2 * kGuardBytes + static_cast<std::size_t>(width) / 8 + 1,
                                       kGuard);
    std::vector<std::uint8_t> actual = expected;
    plain(gray.data() + shift, expected.data() + kGuardBytes, width, argument);
    fast(gray.data() + shift, actual.data() + kGuardBytes, width, argument);
    ASSERT_EQ(expected, actual) << "width " << width << ", shift " << shift << ", argument "
                                << argument;
}

TEST(FastBits, GiveTheBitsOfThePlainOnes) {
    ForEachInstructionSet([&] {
        for (const std::int32_t width :
             {0, 1, 7, 8, 9, 15, 16, 17, 31, 32, 33, 63, 64, 65, 70, 127, 128, 200, 1003}) {
            for (std::int32_t y = 0; y < 9; ++y) {
                ASSERT_NO_FATAL_FAILURE(
                    ExpectSameBits(PlainOrderedBitsFromGray, OrderedBitsFromGray, width, 1, y));
            }
            for (const std::int32_t level : {-1, 0, 1, 127, 128, 254, 255, 256}) {
                ASSERT_NO_FATAL_FAILURE(
                    ExpectSameBits(PlainThresholdBits, ThresholdBits, width, 3, level));
            }
        }
    });
}

}  // namespace
}  // namespace zm::test
