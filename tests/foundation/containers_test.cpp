#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <vector>

#include "engine/foundation/zmutils_fpguard.h"
#include "engine/foundation/zmutils_integermap.h"
#include "engine/foundation/zmutils_lists.h"
#include "engine/foundation/zmutils_random.h"

namespace zm {
namespace {

using TPairs = std::vector<std::pair<std::int64_t, std::int64_t>>;

TPairs Walk(TZmIntegerMap& map) {
    TPairs pairs;
    std::pair<std::int64_t, std::int64_t> pair;
    map.IterateBegin();
    while (map.IterateNext(pair.first, pair.second)) {
        pairs.push_back(pair);
    }
    return pairs;
}

TEST(IntegerMap, ABucketsNewestEntryComesFirst) {
    TZmIntegerMap map(4);
    EXPECT_TRUE(map.Insert(1, 10));
    EXPECT_TRUE(map.Insert(5, 50));  // bucket 1 as well
    EXPECT_TRUE(map.Insert(0, 0));
    EXPECT_TRUE(map.Insert(-1, 9));  // 2 to the 64th less 1: bucket 3
    EXPECT_TRUE(map.Insert(9, 90));  // bucket 1
    EXPECT_FALSE(map.Insert(5, 51));
    EXPECT_EQ(map.GetKeysCount(), 5);
    EXPECT_EQ(Walk(map), (TPairs{{0, 0}, {9, 90}, {5, 50}, {1, 10}, {-1, 9}}));
    EXPECT_EQ(map.Get(5), 50);
    EXPECT_EQ(map.Get(13), std::nullopt);
    EXPECT_FALSE(map.KeyExists(2));
}

TEST(IntegerMap, LargeKeysClearAndOddSizes) {
    TZmIntegerMap map(0x40000);
    EXPECT_TRUE(map.Insert(INT64_C(0x100000008)));
    EXPECT_FALSE(map.KeyExists(8)) << "the high half counts";
    map.Clear();
    EXPECT_TRUE(Walk(map).empty());
    EXPECT_TRUE(map.Insert(INT64_C(0x100000008)));
    TZmIntegerMap one(-3);
    EXPECT_TRUE(one.Insert(1) && one.Insert(2));
    EXPECT_EQ(Walk(one).front().first, 2);
    std::int64_t key = 0;
    std::int64_t value = 0;
    one.IterateBegin();
    one.Insert(1000);
    EXPECT_FALSE(one.IterateNext(key, value)) << "an insertion ends a walk";
}

TEST(RgbMap, ColoursAreTheirThreeBytes) {
    TZmRGBMap map(256);
    const TRGB reddish{.b = 1, .g = 2, .r = 3};
    EXPECT_TRUE(map.Insert({.b = 3, .g = 2, .r = 1}, 8) && map.Insert(reddish, 7));
    EXPECT_EQ(map.Get(reddish), 7);
    TRGB key;
    std::int64_t value = 0;
    map.IterateBegin();
    ASSERT_TRUE(map.IterateNext(key, value));
    EXPECT_EQ(key, reddish) << "bucket 1, by the blue byte";
}

template <typename TNumberList>
std::string TextOf(const TNumberList& list) {
    std::string text;
    for (std::int32_t i = 0; i < list.GetCount(); ++i) {
        text += std::to_string(static_cast<int>(list.GetItem(i))) + " ";
    }
    return text;
}

TEST(Lists, ItemsComeGoAndMove) {
    TZmIntegerList list;
    EXPECT_EQ(list.Add(5), 0);
    EXPECT_EQ(list.Add(7), 1);
    list.Insert(0, 1);
    list.Insert(3, 9);
    list.Insert(2, INT32_MIN);
    EXPECT_EQ(list.GetItem(2), INT32_MIN);
    list.SetItem(2, 6);
    list.ExchangeItems(0, 4);
    EXPECT_EQ(TextOf(list), "9 5 6 7 1 ");
    list.Delete(1);
    list.Delete(3);
    EXPECT_EQ(TextOf(list), "9 6 7 ");
    EXPECT_EQ(list.IndexOf(7), 2);
    EXPECT_EQ(list.IndexOf(1), -1);
    TZmIntegerList copy;
    copy.Add(3);
    copy.Assign(list);
    list.Clear();
    EXPECT_EQ(TextOf(copy), "9 6 7 ");
    EXPECT_EQ(list.GetCount(), 0);
    EXPECT_THROW(TZmDoubleList().Assign(copy), EZmException);
}

TEST(Lists, IndexesOutsideRaise) {
    TZmDoubleList list;
    list.Add(1.5);
    for (const std::int32_t index : {-1, 1, INT32_MAX, INT32_MIN}) {
        EXPECT_THROW(list.GetItem(index), EZmException);
        EXPECT_THROW(list.SetItem(index, 0), EZmException);
        EXPECT_THROW(list.Delete(index), EZmException);
        EXPECT_THROW(list.ExchangeItems(0, index), EZmException);
    }
    EXPECT_THROW(list.Insert(2, 0), EZmException);
    list.SetCapacity(-1);
    EXPECT_EQ(list.GetItem(0), 1.5);
}

TEST(Lists, SortsStablyWithAnyComparison) {
    TZmIntegerList list;
    for (const std::int32_t item : {52, 31, 50, 11, 30, 51, 10, 32}) {
        list.Add(item);
    }
    const auto tens = [](const void* item) { return *static_cast<const std::int32_t*>(item) / 10; };
    list.Sort([&](const void* a, const void* b) { return tens(a) - tens(b); });
    EXPECT_EQ(TextOf(list), "11 10 31 30 32 52 50 51 ");
    list.SortAscending();
    EXPECT_EQ(TextOf(list), "10 11 30 31 32 50 51 52 ");
    int turn = 0;
    list.Sort([&](const void*, const void*) { return ++turn % 3 - 1; });
    list.SortAscending();
    EXPECT_EQ(TextOf(list), "10 11 30 31 32 50 51 52 ") << "no item is lost or doubled";
}

TEST(Lists, TellWhatChangedAndAskForTheCurrentValue) {
    TZmDoubleList list;
    EXPECT_EQ(list.fChanged, zmlcNone);
    EXPECT_EQ(list.GetCurrentValue(), 0.0);
    list.SetCurrentValue(4);
    EXPECT_EQ(list.fChanged, zmlcNone) << "nobody holds the value";
    double current = 2.5;
    list.fOnGetCurrentValue = [&](TZmList&, void* item) { *static_cast<double*>(item) = current; };
    list.fOnSetCurrentValue = [&](TZmList&, void* item) { current = *static_cast<double*>(item); };
    EXPECT_EQ(list.GetCurrentValue(), 2.5);
    list.SetCurrentValue(4);
    EXPECT_EQ(current, 4.0);
    EXPECT_EQ(list.fChanged, zmlcCurrentValue);
    list.Add(1);
    EXPECT_EQ(list.fChanged, zmlcCurrentValue | zmlcItems);
}

TEST(RandomGenerator, GivesThePublishedSequence) {
    TZmRandomGenerator generator(0);
    for (const std::uint32_t expected :
         {3701687786u, 458299110u, 2500872618u, 3633119408u, 516391518u}) {
        EXPECT_EQ(generator.Next(), expected);
    }
    TZmRandomGenerator seeded(0xDEADBEEF);
    EXPECT_EQ(seeded.Next(), 2152383523u);
    EXPECT_EQ(seeded.Next(), 488944989u);
    EXPECT_EQ(TZmRandomGenerator(0xDEADBEEF).NextINT64(),
              static_cast<std::int64_t>(2152383523ull << 32 | 488944989ull));
}

TEST(FpGuard, MasksAllSixAndPutsBackWhatItFound) {
    const platform::TFpMasks before = platform::GetFpMasks();
    const platform::TFpMasks open{
        .x87 = static_cast<std::uint8_t>(platform::kAllFpExceptions & ~platform::fpZeroDivide),
        .sse = static_cast<std::uint8_t>(platform::kAllFpExceptions & ~platform::fpZeroDivide &
                                         ~platform::fpDenormal)};
    platform::SetFpMasks(open);
    volatile double zero = 0;
    volatile long double long_zero = 0;
    {
        const TZmFPExceptionsDisabler guard;
        EXPECT_EQ(platform::GetFpMasks(), platform::TFpMasks{});
        EXPECT_GT(1 / zero, 1e300);
        EXPECT_GT(1 / long_zero, 1e300L);
    }
    EXPECT_EQ(platform::GetFpMasks(), open);
    volatile long double two = 2;
    two = two * 2;  // the division's flag is gone: nothing is raised late
    platform::SetFpMasks(before);
    EXPECT_EQ(platform::GetFpMasks(), before);
}

}  // namespace
}  // namespace zm
