#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <vector>

#include "engine/bitmap/zmmask.h"

namespace zm::test {
namespace {

constexpr std::int32_t kMin = std::numeric_limits<std::int32_t>::min();
constexpr std::int32_t kMax = std::numeric_limits<std::int32_t>::max();
constexpr std::int32_t kDepths[] = {1, 8};

using TRows = std::vector<std::string>;

/// The mask as rows of '#' for set pixels and '.' for clear ones.
TRows RowsOf(TZmMask& mask) {
    TRows rows;
    for (std::int32_t y = 0; y < mask.GetHeight(); ++y) {
        std::string row;
        for (std::int32_t x = 0; x < mask.GetWidth(); ++x) {
            row += mask.IsPointInside(x, y) ? '#' : '.';
        }
        rows.push_back(row);
    }
    return rows;
}

void SetRows(TZmMask& mask, std::int32_t depth, const TRows& rows, std::int32_t value = 255) {
    const auto width = static_cast<std::int32_t>(rows[0].size());
    ASSERT_TRUE(mask.AllocateBits(width, static_cast<std::int32_t>(rows.size()), depth));
    for (std::int32_t y = 0; y < mask.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < width; ++x) {
            mask.SetPixel(
                x, y,
                rows[static_cast<std::size_t>(y)][static_cast<std::size_t>(x)] == '#' ? value : 0);
        }
    }
}

/// The rectangle is the one that the pixels have.
void ExpectTightRect(TZmMask& mask) {
    TZmMask scanned;
    scanned.Assign(mask);
    scanned.SyncRect();
    EXPECT_EQ(mask.GetX1(), scanned.GetX1());
    EXPECT_EQ(mask.GetY1(), scanned.GetY1());
    EXPECT_EQ(mask.GetX2(), scanned.GetX2());
    EXPECT_EQ(mask.GetY2(), scanned.GetY2());
}

TEST(MaskRectangle, IsInclusiveAndClipped) {
    struct TCase {
        std::int32_t x1, y1, x2, y2;
        TRows rows;
    };
    const TCase kCases[] = {
        {1, 1, 3, 1, {"..........", ".###......", ".........."}},
        {7, 0, 8, 1, {".......##.", ".......##.", ".........."}},
        {-5, -5, 1, 0, {"##........", "..........", ".........."}},
        {9, 2, kMax, kMax, {"..........", "..........", ".........#"}},
        {kMin, 1, kMax, 1, {"..........", "##########", ".........."}},
        {3, 1, 2, 1, {"..........", "..........", ".........."}},
        {3, 2, 4, 1, {"..........", "..........", ".........."}},
        {10, 0, 20, 2, {"..........", "..........", ".........."}},
    };
    for (const std::int32_t depth : kDepths) {
        for (const TCase& test : kCases) {
            TZmMask mask;
            ASSERT_TRUE(mask.AllocateBits(10, 3, depth));
            mask.SetRectangle(test.x1, test.y1, test.x2, test.y2, 9);
            EXPECT_EQ(RowsOf(mask), test.rows);
            ExpectTightRect(mask);
            EXPECT_FALSE(mask.GetFull());
        }
    }
}

TEST(MaskRectangle, TakesAndGivesTheFullMark) {
    for (const std::int32_t depth : kDepths) {
        TZmMask mask;
        ASSERT_TRUE(mask.AllocateBits(10, 3, depth));
        mask.SetRectangle(-1, 0, 9, 3, 255);
        EXPECT_TRUE(mask.GetFull());
        mask.SetRectangle(2, 1, 5, 1, 255);
        EXPECT_TRUE(mask.GetFull());
        mask.SetRectangle(2, 1, 5, 1, 0);
        EXPECT_FALSE(mask.GetFull());
        EXPECT_EQ(mask.GetX1(), 0);  // clearing never shrinks the rectangle
        EXPECT_EQ(RowsOf(mask)[1], "##....####");
    }
    TZmMask empty;
    empty.SetRectangle(0, 0, 5, 5, 255);
    EXPECT_TRUE(empty.IsEmpty());
}

TEST(MaskEllipse, HoldsThePixelsWhoseCentresLieInside) {
    struct TCase {
        std::int32_t x, y, width, height;
        TRows rows;
    };
    const TCase kCases[] = {
        {4, 2, 9, 5, {"..#####...", "#########.", "#########.", "#########.", "..#####..."}},
        {2, 2, 4, 4, {".##.......", "####......", "####......", ".##.......", ".........."}},
        {9, 0, 1, 1, {".........#", "..........", "..........", "..........", ".........."}},
        {0, 4, 9, 5, {"..........", "..........", "###.......", "#####.....", "#####....."}},
    };
    for (const std::int32_t depth : kDepths) {
        for (const TCase& test : kCases) {
            TZmMask mask;
            ASSERT_TRUE(mask.AllocateBits(10, 5, depth));
            mask.SetEllipse(test.x, test.y, test.width, test.height, 77);
            EXPECT_EQ(RowsOf(mask), test.rows);
            ExpectTightRect(mask);
            EXPECT_EQ(mask.GetPixel(test.x, test.y), depth == 8 ? 77 : 1);
        }
    }
}

TEST(MaskEllipse, TakesAnySize) {
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(10, 5, 8));
    mask.SetEllipse(0, 0, -3, 5, 255);
    mask.SetEllipse(0, 0, 5, 0, 255);
    mask.SetEllipse(kMax, kMax, 7, 7, 255);
    mask.SetEllipse(kMin, kMin, kMax, kMax, 255);
    EXPECT_TRUE(mask.IsEmpty());
    mask.SetEllipse(5, 2, kMax, kMax, 255);
    EXPECT_EQ(RowsOf(mask), TRows(5, "##########"));
}

TEST(MaskPolygon, HoldsEdgesAndInsideByTheEvenOddRule) {
    struct TCase {
        std::vector<TPoint> points;
        TRows rows;
    };
    const TCase kCases[] = {
        {{{1, 1}, {4, 1}, {4, 3}, {1, 3}}, {"......", ".####.", ".####.", ".####.", "......"}},
        {{{0, 0}, {6, 0}, {3, 3}}, {"######", ".#####", "..###.", "...#..", "......"}},
        {{{0, 0}, {4, 4}, {4, 0}, {0, 4}}, {"#...#.", "##.##.", "#####.", "##.##.", "#...#."}},
        // The sloping edges meet rows 1 and 3 half-way between two pixels.
        {{{0, 0}, {5, 2}, {0, 4}}, {"#.....", "###...", "######", "###...", "#....."}},
        {{{2, 3}}, {"......", "......", "......", "..#...", "......"}},
        {{{4, 1}, {1, 1}}, {"......", ".####.", "......", "......", "......"}},
        {{{-3, -1}, {2, -1}, {2, 1}, {-3, 1}}, {"###...", "###...", "......", "......", "......"}},
        {{}, {"......", "......", "......", "......", "......"}},
    };
    for (const std::int32_t depth : kDepths) {
        for (const TCase& test : kCases) {
            TZmMask mask;
            ASSERT_TRUE(mask.AllocateBits(6, 5, depth));
            mask.DrawPolygon(test.points, 200);
            EXPECT_EQ(RowsOf(mask), test.rows);
            ExpectTightRect(mask);
            std::vector<TPoint> reversed(test.points.rbegin(), test.points.rend());
            TZmMask other;
            ASSERT_TRUE(other.AllocateBits(6, 5, depth));
            other.DrawPolygon(reversed, 200);
            EXPECT_EQ(RowsOf(other), test.rows);
        }
    }
}

TEST(MaskPolygon, IsExactForFarCorners) {
    TZmMask mask;
    ASSERT_TRUE(mask.AllocateBits(5, 4, 1));
    // Left of the line x = y, whose ends lie as far away as numbers go.
    mask.DrawPolygon(std::vector<TPoint>{{kMin, kMin}, {kMax, kMax}, {kMin, kMax}}, 1);
    EXPECT_EQ(RowsOf(mask), (TRows{"#....", "##...", "###..", "####."}));
    mask.Empty();
    // Left of the line through (0, -1) and (2, 3): x = (y + 1) / 2, at a slope of 2 : 1.
    mask.DrawPolygon(std::vector<TPoint>{{-1000000, -2000001}, {1000000, 1999999}, {-9, 1999999}},
                     1);
    EXPECT_EQ(RowsOf(mask), (TRows{"#....", "##...", "##...", "###.."}));
}

TEST(MaskPolygon, AddsToWhatIsThere) {
    TZmMask mask;
    SetRows(mask, 8, {"#....", ".....", "....#"}, 40);
    mask.DrawPolygon(std::vector<TPoint>{{1, 1}, {3, 1}}, 90);
    EXPECT_EQ(RowsOf(mask), (TRows{"#....", ".###.", "....#"}));
    EXPECT_EQ(mask.GetPixel(0, 0), 40);
    EXPECT_EQ(mask.GetPixel(2, 1), 90);
}

TEST(MaskNegative, TurnsValuesOver) {
    TZmMask bytes;
    ASSERT_TRUE(bytes.AllocateBits(3, 1, 8));
    bytes.SetPixel(0, 0, 255);
    bytes.SetPixel(1, 0, 100);
    bytes.Negative(255);
    EXPECT_EQ(bytes.GetPixel(0, 0), 0);
    EXPECT_EQ(bytes.GetPixel(1, 0), 155);
    EXPECT_EQ(bytes.GetPixel(2, 0), 255);
    EXPECT_EQ(bytes.GetX1(), 1);
    bytes.Negative(200);
    EXPECT_EQ(bytes.GetPixel(0, 0), 200);
    EXPECT_EQ(bytes.GetPixel(1, 0), 45);
    EXPECT_EQ(bytes.GetPixel(2, 0), 0);  // 200 - 255
    EXPECT_EQ(bytes.GetX2(), 1);
    TZmMask bits;
    SetRows(bits, 1, {"#.......##", ".........."});
    bits.Negative(1);
    EXPECT_EQ(RowsOf(bits), (TRows{".#######..", "##########"}));
    ExpectTightRect(bits);
    bits.Empty();
    bits.Negative(1);
    EXPECT_TRUE(bits.GetFull());
}

TEST(MaskIntersect, ClearsOutside) {
    struct TCase {
        std::int32_t x1, y1, x2, y2;
        TRows rows;
    };
    const TCase kCases[] = {
        {2, 1, 9, 1, {"...........", "..####..##.", "..........."}},
        {kMin, kMin, kMax, kMax, {"###........", "######..###", "..........#"}},
        {5, 0, 4, 2, {"...........", "...........", "..........."}},
        {0, 2, 9, 1, {"...........", "...........", "..........."}},
        {11, 0, 20, 2, {"...........", "...........", "..........."}},
        {kMin, 0, 0, 0, {"#..........", "...........", "..........."}},
    };
    for (const std::int32_t depth : kDepths) {
        for (const TCase& test : kCases) {
            TZmMask mask;
            SetRows(mask, depth, {"###........", "######..###", "..........#"});
            mask.Intersect(test.x1, test.y1, test.x2, test.y2);
            EXPECT_EQ(RowsOf(mask), test.rows);
            ExpectTightRect(mask);
        }
        TZmMask full;
        ASSERT_TRUE(full.AllocateBits(9, 2, depth));
        full.Fill(255);
        full.Intersect(0, 0, 8, 1);
        EXPECT_TRUE(full.GetFull());
        full.Intersect(0, 0, 7, 1);
        EXPECT_FALSE(full.GetFull());
    }
}

TEST(MaskTranslate, CutsOrStopsAtTheBorder) {
    struct TCase {
        std::int32_t ox, oy;
        bool cut;
        TRows rows;
    };
    const TRows kStart = {"..........", ".##.......", "..#.......", ".........."};
    const TCase kCases[] = {
        {0, 0, true, kStart},
        {6, 1, true, {"..........", "..........", ".......##.", "........#."}},
        {-2, -1, true, {"#.........", "#.........", "..........", ".........."}},
        {-2, -1, false, {"##........", ".#........", "..........", ".........."}},
        {kMax, kMin, true, {"..........", "..........", "..........", ".........."}},
        {kMax, kMin, false, {"........##", ".........#", "..........", ".........."}},
        {kMin, kMax, false, {"..........", "..........", "##........", ".#........"}},
    };
    for (const std::int32_t depth : kDepths) {
        for (const TCase& test : kCases) {
            TZmMask mask;
            SetRows(mask, depth, kStart, 70);
            mask.TranslateBitmap(test.ox, test.oy, test.cut);
            EXPECT_EQ(RowsOf(mask), test.rows) << test.ox << ", " << test.oy;
            ExpectTightRect(mask);
        }
    }
    TZmMask empty;
    empty.TranslateBitmap(3, 3, true);
    EXPECT_TRUE(empty.IsEmpty());
}

TEST(MaskResize, KeepsWhatBothSizesHave) {
    const TRows kStart = {"#........#", ".#........", "..#......#"};
    for (const std::int32_t depth : kDepths) {
        TZmMask mask;
        SetRows(mask, depth, kStart, 33);
        ASSERT_TRUE(mask.Resize(12, 2));
        EXPECT_EQ(RowsOf(mask), (TRows{"#........#..", ".#.........."}));
        ExpectTightRect(mask);
        EXPECT_EQ(mask.GetPixel(9, 0), depth == 8 ? 33 : 1);
        ASSERT_TRUE(mask.Resize(1, 1));
        EXPECT_EQ(RowsOf(mask), TRows{"#"});
        EXPECT_EQ(mask.GetFull(), depth == 1);
        for (const std::int32_t size : {0, -1, kMin}) {
            EXPECT_FALSE(mask.Resize(size, 4));
            EXPECT_FALSE(mask.Resize(4, size));
        }
        EXPECT_FALSE(mask.Resize(kMax, kMax));
        EXPECT_EQ(RowsOf(mask), TRows{"#"});
    }
    TZmMask empty;
    EXPECT_FALSE(empty.Resize(4, 4));
}

TEST(MaskResample, TakesTheNearestPixelBelow) {
    for (const std::int32_t depth : kDepths) {
        TZmMask mask;
        SetRows(mask, depth, {"#.#", ".#."}, 255);
        const auto larger = mask.CreateResampledMask(7, 5);  // columns 0001122, rows 00011
        ASSERT_NE(larger, nullptr);
        EXPECT_EQ(RowsOf(*larger), (TRows{"###..##", "###..##", "###..##", "...##..", "...##.."}));
        EXPECT_EQ(larger->GetBitsPerPixel(), depth);
        ExpectTightRect(*larger);
        const auto smaller = mask.CreateResampledMask(2, 1);  // columns 0 and 1
        ASSERT_NE(smaller, nullptr);
        EXPECT_EQ(RowsOf(*smaller), TRows{"#."});
        mask.Fill(255);
        EXPECT_TRUE(mask.CreateResampledMask(9, 9)->GetFull());
        EXPECT_EQ(mask.CreateResampledMask(0, 5), nullptr);
        EXPECT_EQ(mask.CreateResampledMask(5, -5), nullptr);
        EXPECT_EQ(mask.CreateResampledMask(kMax, kMax), nullptr);
    }
    TZmMask empty;
    EXPECT_EQ(empty.CreateResampledMask(2, 2), nullptr);
}

}  // namespace
}  // namespace zm::test
