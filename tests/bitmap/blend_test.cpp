#include "engine/bitmap/zmblend.h"

#include <gtest/gtest.h>

#include <array>
#include <vector>

#include "engine/bitmap/zmblend_p.h"
#include "tests/support/instructionsets.h"

namespace zm {
namespace {

struct TChannelCases {
    TZmRenderOperation operation;
    std::vector<std::array<int, 3>> values;  // source, destination, result
};

// Worked by hand from the operations' formulas.
const TChannelCases kChannelCases[] = {
    {zmlNormal, {{200, 10, 200}}},
    {zmlAdd, {{100, 100, 200}, {200, 100, 255}}},
    {zmlSub, {{200, 50, 150}, {50, 200, 150}}},
    {zmlDiv, {{3, 200, 66}, {255, 255, 1}, {0, 77, 77}}},  // the last divides by 1
    {zmlMul, {{255, 255, 254}, {100, 200, 78}}},           // 65025 / 256
    {zmlOR, {{0x3C, 0xF0, 0xFC}}},
    {zmlAND, {{0x3C, 0xF0, 0x30}}},
    {zmlXOR, {{0x3C, 0xF0, 0xCC}}},
    {zmlMAX, {{9, 200, 200}, {201, 200, 201}}},
    {zmlMIN, {{9, 200, 9}, {201, 200, 200}}},
    {zmlAverage, {{255, 254, 254}}},
    // 255 - 8525 / 255 = 221.57; the second quotient is whole
    {zmlScreen, {{100, 200, 221}, {0, 51, 51}, {255, 17, 255}, {0, 0, 0}}},
    {zmlNegation, {{100, 100, 200}, {200, 200, 110}}},
    {zmlExclusion, {{100, 100, 122}, {200, 200, 88}}},  // 144 - 312 wraps
    {zmlOverlay, {{100, 200, 189}, {200, 100, 156}, {255, 127, 253}, {0, 128, 2}}},
    {zmlHardLight, {{200, 100, 189}, {100, 200, 156}, {128, 0, 2}}},
    {zmlXFader, {{100, 200, 190}, {255, 255, 254}}},  // M = 78; ((255 - 33 - 78) * 200 >> 8) + 78
    {zmlColorEdge, {{50, 200, 249}, {254, 10, 255}, {255, 0, 255}}},
    {zmlColorBurn, {{100, 200, 115}, {10, 100, 0}, {0, 255, 0}}},
    {zmlInverseColorDodge, {{50, 200, 232}, {10, 255, 255}}},
    {zmlInverseColorBurn, {{200, 100, 115}, {200, 0, 0}}},
    {zmlSoftDodge, {{200, 100, 185}, {100, 120, 99}, {255, 0, 255}}},
    {zmlSoftBurn, {{200, 100, 156}, {100, 120, 94}, {0, 255, 255}}},
    {zmlReflect, {{50, 200, 195}, {200, 200, 255}, {255, 0, 255}}},
    {zmlGlow, {{50, 200, 45}, {3, 255, 255}}},
    {zmlFreeze, {{100, 200, 225}, {10, 100, 0}, {0, 255, 0}}},
    {zmlEat, {{100, 200, 135}, {200, 0, 0}}},
    {zmlSubtractive, {{200, 100, 44}, {100, 100, 0}}},
    // 32 + 96, the cosines of 60 and 120 degrees; 128 + 128
    {zmlInterpolation, {{85, 170, 128}, {255, 255, 255}, {0, 255, 128}}},
    {zmlStamp, {{100, 100, 44}, {200, 200, 255}, {50, 100, 0}}},
};

TEST(Blend, ChannelOperationsGiveTheWorkedValues) {
    for (const auto& [operation, values] : kChannelCases) {
        for (const auto& [a, b, expected] : values) {
            const auto source = static_cast<std::uint8_t>(a);
            const auto dest = static_cast<std::uint8_t>(b);
            // The other channels hold other values: each channel has to look at its own.
            TRGB pixel{dest, 0, dest};
            ZmBlendPixel(TRGB{source, 255, source}, pixel, operation, 0);
            EXPECT_EQ(expected, pixel.b)
                << "operation " << int{operation} << ": " << a << ", " << b;
            EXPECT_EQ(pixel.b, pixel.r) << "operation " << int{operation};
        }
    }
}

struct TPixelCase {
    TZmRenderOperation operation;
    TRGB source;  // blue, green, red
    TRGB dest;
    TRGB expected;
    std::uint8_t row = 0;
};

constexpr TRGB kPink{100, 100, 200};
constexpr TPixelCase kPixelCases[] = {
    {zmlSoftLight, {9, 9, 51}, {102, 0, 255}, {65, 0, 255}},     // red 51 acts on all channels
    {zmlSoftLight, {0, 51, 204}, {102, 102, 0}, {137, 137, 0}},  // sqrt(.4) * .6 + .16
    {zmlRed, {1, 2, 3}, {4, 5, 6}, {4, 5, 3}},
    {zmlGreen, {1, 2, 3}, {4, 5, 6}, {4, 2, 6}},
    {zmlBlue, {1, 2, 3}, {4, 5, 6}, {1, 5, 6}},
    {zmlHue, {0, 255, 0}, kPink, {100, 200, 100}},
    {zmlHue, {0, 128, 255}, kPink, {100, 150, 200}},  // 100 + 100 * 128 / 255
    {zmlHue, {255, 128, 0}, kPink, {200, 150, 100}},
    {zmlHue, {128, 0, 255}, kPink, {150, 100, 200}},  // a negative hue goes round
    {zmlSaturation, {80, 80, 80}, kPink, {150, 150, 150}},
    {zmlSaturation, {0, 0, 255}, kPink, {45, 45, 255}},
    {zmlColor, {0, 255, 0}, kPink, {45, 255, 45}},
    {zmlLuminosity, {150, 150, 150}, {0, 0, 255}, {45, 45, 255}},
    {zmlLuminosity, {50, 50, 50}, {0, 0, 255}, {0, 0, 100}},  // dark: Q = 2 L
    {zmlStereoBW, {30, 20, 10}, {200, 50, 100}, {18, 18, 72}},
    {zmlStereoColor, {1, 2, 3}, {4, 5, 6}, {1, 2, 3}},
    {zmlStereoColorDubois, {0, 0, 0}, {100, 100, 100}, {0, 0, 113}},
    {zmlStereoColorDubois, {100, 100, 100}, {0, 0, 0}, {104, 109, 0}},
    {zmlStereoColorDubois, {100, 0, 0}, {0, 0, 200}, {120, 0, 91}},
    {zmlStereoEven, {1, 2, 3}, {4, 5, 6}, {1, 2, 3}, 2},
    {zmlStereoEven, {1, 2, 3}, {4, 5, 6}, {4, 5, 6}, 3},
    {zmlStereoOdd, {1, 2, 3}, {4, 5, 6}, {4, 5, 6}, 2},
    {zmlStereoOdd, {1, 2, 3}, {4, 5, 6}, {1, 2, 3}, 255},
    {zmlLuminosity2, {100, 100, 100}, {50, 100, 200}, {25, 75, 175}},
};

TEST(Blend, PixelOperationsGiveTheWorkedValues) {
    for (const TPixelCase& sample : kPixelCases) {
        TRGB pixel = sample.dest;
        ZmBlendPixel(sample.source, pixel, sample.operation, sample.row);
        EXPECT_EQ(sample.expected, pixel)
            << "operation " << int{sample.operation} << ": blue " << int{pixel.b} << ", green "
            << int{pixel.g} << ", red " << int{pixel.r};
    }
}

TEST(Blend, EveryOperationHasAWorkedValue) {
    std::vector<bool> seen(kRenderOperationCount);
    for (const TChannelCases& sample : kChannelCases) {
        seen[sample.operation] = true;
    }
    for (const TPixelCase& sample : kPixelCases) {
        seen[sample.operation] = true;
    }
    for (std::size_t i = 0; i < seen.size(); ++i) {
        EXPECT_TRUE(seen[i]) << "operation " << i;
    }
}

TEST(Blend, OrdinalsBehindTheLastLeaveTheDestination) {
    for (int operation = 44; operation < 256; ++operation) {
        TRGB pixel{4, 5, 6};
        ZmBlendPixel(TRGB{1, 2, 3}, pixel, static_cast<std::uint8_t>(operation), 0);
        ASSERT_EQ((TRGB{4, 5, 6}), pixel) << operation;
    }
}

// Fast rows against the plain ones.

constexpr std::size_t kGuard = 32;
constexpr std::uint8_t kGuardByte = 0xA5;

/// A row with guard bytes at both ends.
class TGuardedRow {
public:
    TGuardedRow(const TRGB* pixels, std::int32_t width)
        : bytes_(2 * kGuard + static_cast<std::size_t>(width) * 3, kGuardByte) {
        std::copy_n(pixels, width, Get());
    }
    TRGB* Get() { return reinterpret_cast<TRGB*>(bytes_.data() + kGuard); }
    friend bool operator==(const TGuardedRow&, const TGuardedRow&) = default;

private:
    std::vector<std::uint8_t> bytes_;
};

/// All pairs of channel values, in an order in which neighbours differ.
void MakeAllPairs(std::vector<TRGB>& source, std::vector<TRGB>& dest) {
    for (unsigned i = 0; i < 65536; ++i) {
        const auto byte = [](unsigned value) { return static_cast<std::uint8_t>(value); };
        source.push_back(TRGB{byte(i), byte(i * 7), byte(i * 13 + (i >> 8))});
        dest.push_back(TRGB{byte(i >> 8), byte(i * 3 + (i >> 8)), byte(i >> 3)});
    }
}

TEST(FastBlend, RowsEqualPlainOnesForAllChannelPairs) {
    std::vector<TRGB> source;
    std::vector<TRGB> dest;
    MakeAllPairs(source, dest);
    for (int operation = 0; operation < 46; ++operation) {
        std::vector<TRGB> plain = dest;
        const auto ordinal = static_cast<std::uint8_t>(operation);
        BlendRowPlain(source.data(), plain.data(), 65536, ordinal, 1);
        test::ForEachInstructionSet([&] {
            std::vector<TRGB> fast = dest;
            BlendRow(source.data(), fast.data(), 65536, ordinal, 1);
            ASSERT_TRUE(plain == fast) << "operation " << operation;
        });
    }
}

TEST(FastBlend, RowsEqualPlainOnesAtEveryWidth) {
    std::vector<TRGB> source;
    std::vector<TRGB> dest;
    MakeAllPairs(source, dest);
    for (std::int32_t width = 0; width <= 70; ++width) {
        const TRGB* const from = source.data() + 1000 + width;
        const TRGB* const to = dest.data() + 900 * width;
        for (std::uint8_t operation = 0; operation < kRenderOperationCount; ++operation) {
            TGuardedRow plain(to, width);
            BlendRowPlain(from, plain.Get(), width, operation, 2);
            test::ForEachInstructionSet([&] {
                TGuardedRow fast(to, width);
                BlendRow(from, fast.Get(), width, operation, 2);
                ASSERT_TRUE(plain == fast) << "operation " << int{operation} << ", width " << width;
            });
        }
    }
}

TEST(Blend, MixingWeighsByA256th) {
    EXPECT_EQ(254, MixChannel(255, 0, 255));
    EXPECT_EQ(0, MixChannel(0, 255, 255));    // 255 - 254.004 rounded down
    EXPECT_EQ(128, MixChannel(0, 255, 127));  // 255 - 126.5 rounded down
    EXPECT_EQ(77, MixChannel(200, 77, 0));
}

/// Every rule on one row, and the even mix by its first weight.
void ExpectSameMixes(const TRGB* from, const TRGB* to, std::vector<std::uint8_t> weights,
                     std::int32_t width) {
    for (const TMixRule& rule : {TMixRule{}, TMixRule{255, 40000}, TMixRule{99, 65535},
                                 TMixRule{0, 65536}, TMixRule{180, 0}}) {
        TGuardedRow plain(to, width);
        TGuardedRow fast(to, width);
        MixRowPlain(from, weights.data(), rule, plain.Get(), width);
        MixRow(from, weights.data(), rule, fast.Get(), width);
        ASSERT_TRUE(plain == fast) << "width " << width << ", limit " << int{rule.limit};
    }
    weights.assign(weights.size(), weights[0]);
    TGuardedRow plain(to, width);
    TGuardedRow fast(to, width);
    MixRowPlain(from, weights.data(), TMixRule{}, plain.Get(), width);
    MixRowEvenly(from, weights[0], fast.Get(), width);
    ASSERT_TRUE(plain == fast) << "width " << width << ", weight " << int{weights[0]};
}

TEST(FastBlend, MixingEqualsThePlainOne) {
    std::vector<TRGB> source;
    std::vector<TRGB> dest;
    MakeAllPairs(source, dest);
    test::ForEachInstructionSet([&] {
        for (std::int32_t width = 0; width <= 70; ++width) {
            for (int seed = 0; seed < 64; ++seed) {
                std::vector<std::uint8_t> weights(70);
                for (std::size_t x = 0; x < weights.size(); ++x) {
                    weights[x] =
                        static_cast<std::uint8_t>(x * 37 + static_cast<unsigned>(seed) * 4);
                }
                ASSERT_NO_FATAL_FAILURE(ExpectSameMixes(source.data() + 900 * seed + width,
                                                        dest.data() + 700 * seed, weights, width));
            }
        }
    });
}

}  // namespace
}  // namespace zm
