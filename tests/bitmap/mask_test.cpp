#include <gtest/gtest.h>

#include "engine/bitmap/zmbitmapmemory_p.h"
#include "engine/bitmap/zmmask.h"

namespace zm::test {
namespace {

void ExpectRect(const TZmMask& mask, std::int32_t x1, std::int32_t y1, std::int32_t x2,
                std::int32_t y2) {
    EXPECT_EQ(mask.GetX1(), x1);
    EXPECT_EQ(mask.GetY1(), y1);
    EXPECT_EQ(mask.GetX2(), x2);
    EXPECT_EQ(mask.GetY2(), y2);
}

TEST(Mask, LaysRowsOutFromTheBottom) {
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(9, 3, 1));
    EXPECT_EQ(mask.GetRowLen(), 4);
    EXPECT_EQ(mask.GetScanLine(0), mask.GetScanLine(2) + 8);
    mask.SetPixel(1, 0, 1);
    mask.SetPixel(8, 0, 200);
    EXPECT_EQ(mask.GetScanLine(0)[0], 0x40);
    EXPECT_EQ(mask.GetScanLine(0)[1], 0x80);
    EXPECT_EQ(mask.GetPixel(8, 0), 1);
    EXPECT_EQ(mask.GetScanLine(3), nullptr);
    EXPECT_EQ(mask.GetScanLine(-1), nullptr);
}

TEST(Mask, RejectsSizesAndDepths) {
    TZmMask mask;
    EXPECT_FALSE(mask.AllocateBits(0, 4, 8));
    EXPECT_FALSE(mask.AllocateBits(4, -1, 8));
    EXPECT_FALSE(mask.AllocateBits(4, 4, 2));
    EXPECT_EQ(mask.GetScanLine(0), nullptr);
    mask.SetPixel(0, 0, 1);
    EXPECT_TRUE(mask.IsEmpty());
}

TEST(Mask, GrowsItsRectangle) {
    for (const std::int32_t depth : {1, 8}) {
        TZmMask mask;
        ASSERT_TRUE(mask.AllocateBits(10, 8, depth));
        EXPECT_TRUE(mask.IsEmpty());
        ExpectRect(mask, 2147483647, 2147483647, 0, 0);
        mask.SetPixel(-1, 2, 1);
        mask.SetPixel(10, 2, 1);
        mask.SetPixel(2, 0, 0);
        EXPECT_TRUE(mask.IsEmpty());
        mask.SetPixel(3, 5, 1);
        mask.SetPixel(7, 2, 255);
        ExpectRect(mask, 3, 2, 7, 5);
        mask.SetPixel(3, 5, 0);  // clearing never shrinks it
        ExpectRect(mask, 3, 2, 7, 5);
        EXPECT_FALSE(mask.IsPointInside(3, 5));
        EXPECT_TRUE(mask.IsPointInside(7, 2));
        EXPECT_FALSE(mask.IsPointInside(7, -2));
        mask.SyncRect();
        ExpectRect(mask, 7, 2, 7, 2);
        mask.Empty();
        mask.SyncRect();
        EXPECT_TRUE(mask.IsEmpty());
    }
}

TEST(Mask, KnowsWhenItIsFull) {
    struct TCase {
        std::int32_t depth, value;
        bool full_after_write, full_after_sync;
    };
    // A mask of one bit keeps its flag until it is looked through.
    constexpr TCase kCases[] = {
        {8, 254, false, false}, {8, 255, true, true}, {1, 0, true, false}, {1, 1, true, true}};
    for (const TCase& test : kCases) {
        TZmMask mask;
        ASSERT_TRUE(mask.AllocateBits(11, 3, test.depth));
        mask.Fill(255);
        EXPECT_TRUE(mask.GetFull());
        ExpectRect(mask, 0, 0, 10, 2);
        mask.SetPixel(10, 1, test.value);
        EXPECT_EQ(mask.GetFull(), test.full_after_write);
        mask.SyncFull();
        EXPECT_EQ(mask.GetFull(), test.full_after_sync);
    }
    TZmMask bits;
    ASSERT_TRUE(bits.AllocateBits(11, 1, 1));
    for (std::int32_t x = 0; x < 11; ++x) {
        bits.SetPixel(x, 0, 1);
    }
    bits.SyncFull();
    EXPECT_TRUE(bits.GetFull());  // the clear bits behind the last pixel do not count
}

TEST(Mask, WithoutRoomDoesNothing) {
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(100, 100, 8));
    mask.SetPixel(3, 3, 9);
    SetLargestBitmapBlock(5000);
    TZmMask other;
    ASSERT_TRUE(other.AllocateBits(100, 100, 8));  // the rows come later
    other.SetPixel(1, 1, 255);
    other.Fill(255);
    other.SetRectangle(2, 2, 5, 5, 255);
    other.Negative(255);
    other.SyncRect();
    other.SyncFull();
    EXPECT_TRUE(other.IsEmpty());
    EXPECT_FALSE(other.GetFull());
    EXPECT_EQ(other.CreateResampledMask(5, 5), nullptr);
    mask.TranslateBitmap(1, 1, true);
    EXPECT_FALSE(mask.Resize(101, 101));
    EXPECT_EQ(mask.CreateResampledMask(101, 101), nullptr);
    EXPECT_EQ(mask.GetPixel(3, 3), 9);
    other.Assign(mask);
    EXPECT_EQ(other.GetWidth(), 0);
    SetLargestBitmapBlock(-1);
}

TEST(Mask, AssignCopiesAll) {
    TZmMask source;
    ASSERT_TRUE(source.AllocateBits(6, 4, 8));
    source.SetPixel(2, 3, 90);
    TZmMask copy;
    copy.Assign(source);
    source.SetPixel(2, 3, 10);
    EXPECT_EQ(copy.GetPixel(2, 3), 90);
    ExpectRect(copy, 2, 3, 2, 3);
    copy.Fill(0);
    EXPECT_TRUE(copy.IsEmpty());
}

}  // namespace
}  // namespace zm::test
