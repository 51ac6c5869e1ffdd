#include "engine/foundation/zmnumbers.h"

#include <gtest/gtest.h>

#include <limits>

namespace zm {
namespace {

/// Quarter steps are exact in a double, so integer arithmetic tells the right answer.
std::int64_t TruncQuarters(std::int64_t quarters) {
    return quarters / 4;
}

std::int64_t RoundQuarters(std::int64_t quarters) {
    std::int64_t whole = quarters / 4;
    std::int64_t rest = quarters % 4;
    if (rest < 0) {
        --whole;
        rest += 4;
    }
    const bool up = rest == 3 || (rest == 2 && whole % 2 != 0);
    return whole + (up ? 1 : 0);
}

void ExpectQuarters(std::int64_t first, std::int64_t last) {
    for (std::int64_t quarters = first; quarters <= last; ++quarters) {
        const double value = static_cast<double>(quarters) / 4;
        ASSERT_EQ(TruncToInt(value), TruncQuarters(quarters)) << value;
        ASSERT_EQ(RoundHalfEven(value), RoundQuarters(quarters)) << value;
    }
}

TEST(Numbers, RoundingOverAllSixteenBitValuesAndTheirTies) {
    ExpectQuarters(-4 * 70000, 4 * 70000);
}

TEST(Numbers, RoundingBesideTheLimitsOfThirtyTwoBits) {
    const std::int64_t top = std::int64_t{4} * kMaxInt32;
    ExpectQuarters(top - 1000, top + 1);
    ExpectQuarters(-top - 4, -top + 1000);
}

TEST(Numbers, RoundingSaturatesAndHasAResultForEveryDouble) {
    const double infinity = std::numeric_limits<double>::infinity();
    EXPECT_EQ(TruncToInt(2147483647.9), kMaxInt32);
    EXPECT_EQ(TruncToInt(2147483648.0), kMaxInt32);
    EXPECT_EQ(TruncToInt(-2147483648.9), kMinInt32);
    EXPECT_EQ(TruncToInt(-2147483649.0), kMinInt32);
    EXPECT_EQ(RoundHalfEven(2147483647.5), kMaxInt32);
    EXPECT_EQ(RoundHalfEven(-2147483648.5), kMinInt32);
    EXPECT_EQ(RoundHalfEven(1e300), kMaxInt32);
    EXPECT_EQ(TruncToInt(infinity), kMaxInt32);
    EXPECT_EQ(TruncToInt(-infinity), kMinInt32);
    EXPECT_EQ(TruncToInt(std::numeric_limits<double>::quiet_NaN()), 0);
    EXPECT_EQ(RoundHalfEven(std::numeric_limits<double>::quiet_NaN()), 0);
    EXPECT_EQ(RoundHalfEven(0.49999999999999994), 0);  // 0.5 added first would give 1
}

TEST(Numbers, ClampsOverEveryValueAroundTheirRanges) {
    for (std::int32_t value = -140000; value <= 140000; ++value) {
        ASSERT_EQ(Clamp8(value), value < 0 ? 0 : value > 255 ? 255 : value);
        ASSERT_EQ(Clamp16(value), value < 0 ? 0 : value > 65535 ? 65535 : value);
    }
    EXPECT_EQ(Clamp8(kMinInt32), 0);
    EXPECT_EQ(Clamp8(kMaxInt32), 255);
    EXPECT_EQ(Clamp16(kMinInt32), 0);
    EXPECT_EQ(Clamp16(kMaxInt32), 65535);
}

TEST(Numbers, WideValuesAreLimitedAndProductsWrapOrAreRefused) {
    EXPECT_EQ(SaturateToInt32(std::int64_t{1} << 32), kMaxInt32);
    EXPECT_EQ(SaturateToInt32(-(std::int64_t{1} << 32)), kMinInt32);
    EXPECT_EQ(SaturateToInt32(-7), -7);
    EXPECT_EQ(WrapMul32(65536, 32768), kMinInt32);
    EXPECT_EQ(WrapMul32(65536, 65536), 0);
    EXPECT_EQ(WrapMul32(-3, 5), -15);
    constexpr std::int64_t kMost = std::numeric_limits<std::int64_t>::max();
    EXPECT_EQ(CheckedMul(3037000499, 3037000499), std::int64_t{9223372030926249001});
    EXPECT_EQ(CheckedMul(3037000500, 3037000500), std::nullopt);
    EXPECT_EQ(CheckedMul(kMost, 1), kMost);
    EXPECT_EQ(CheckedMul(kMost, 2), std::nullopt);
    EXPECT_EQ(CheckedMul(kMost, 0), 0);
    EXPECT_EQ(CheckedMul(-1, 0), std::nullopt);
    EXPECT_EQ(CheckedMul(0, -1), std::nullopt);
    // A block has at most half of what sizes can tell.
    EXPECT_TRUE(FitsAddressSpace(0x7FFFFFFF));
    EXPECT_EQ(FitsAddressSpace(0x80000000), sizeof(std::size_t) > 4);
    EXPECT_FALSE(FitsAddressSpace(-1));
}

}  // namespace
}  // namespace zm
