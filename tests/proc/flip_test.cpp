// Flips: hand-worked rows, fast reversal against the plain one, alpha, and what stays.

#include <gtest/gtest.h>

#include <vector>

#include "engine/proc/zmrotate.h"
#include "engine/proc/zmrotate_p.h"
#include "tests/proc/resample_support.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

TEST(Flip, HandWorked) {
    for (const TZmPixelFormat format : {zm8g, zm16g}) {
        const auto image = GrayPicture(format, {{1, 2, 3}, {4, 5, 6}, {7, 8, 9}});
        image->Flip(fdHorizontal);
        EXPECT_EQ(ValuesOf(*image), (TMatrix{{3, 2, 1}, {6, 5, 4}, {9, 8, 7}}));
        image->Flip(fdVertical);
        EXPECT_EQ(ValuesOf(*image), (TMatrix{{9, 8, 7}, {6, 5, 4}, {3, 2, 1}}));
        image->Flip(fdNone);
        EXPECT_EQ(ValuesOf(*image), (TMatrix{{9, 8, 7}, {6, 5, 4}, {3, 2, 1}}));
    }
}

TEST(Flip, BitsStayAtTheLeft) {
    // 11 pixels: 1011 0001 011 reversed is 110 1000 1101, the unused bits 0.
    const std::uint8_t row[] = {0xB1, 0x7F};
    std::uint8_t out[3] = {0, 0, 77};
    ReverseRow(row, 11, 1, out);
    EXPECT_EQ(out[0], 0xD1);
    EXPECT_EQ(out[1], 0xA0);
    EXPECT_EQ(out[2], 77);
}

TEST(Flip, FastReversalGivesThePlainRows) {
    for (const std::int32_t bit_count : {1, 8, 16, 24, 32, 48}) {
        for (std::int32_t width = 1; width <= 70; ++width) {
            const std::size_t bytes = (static_cast<std::size_t>(width * bit_count) + 7) / 8;
            std::vector<std::uint8_t> row(bytes);
            for (std::size_t i = 0; i < bytes; ++i) {
                row[i] = static_cast<std::uint8_t>(i * 37 + static_cast<unsigned>(width));
            }
            std::vector<std::uint8_t> plain(bytes + 2, 77);
            std::vector<std::uint8_t> fast(bytes + 2, 77);
            ReverseRowPlain(row.data(), width, bit_count, plain.data() + 1);
            ReverseRow(row.data(), width, bit_count, fast.data() + 1);
            ASSERT_EQ(plain, fast) << bit_count << " bits, width " << width;
            EXPECT_EQ(fast.front(), 77);
            EXPECT_EQ(fast.back(), 77);
        }
    }
}

TEST(Flip, EveryFormatMirrorsPixelsAndAlpha) {
    for (const TZmPixelFormat format : kAllFormats) {
        for (const std::int32_t width : {1, 8, 13, 33}) {
            const auto image = MakeNoise(format, width, 7, 3);
            AddNoiseAlpha(*image, 4);
            const bool is_full = image->GetAlphaChannelRaw()->GetFull();
            TZmBitmap before(*image);
            const auto expect_mirrored = [&](bool is_horizontal) {
                for (std::int32_t y = 0; y < 7; ++y) {
                    for (std::int32_t x = 0; x < width; ++x) {
                        const std::int32_t from_x = is_horizontal ? width - 1 - x : x;
                        const std::int32_t from_y = is_horizontal ? y : 6 - y;
                        ASSERT_EQ(ChannelValue(*image, x, y, 0),
                                  ChannelValue(before, from_x, from_y, 0));
                        ASSERT_EQ(image->GetAlpha(x, y), before.GetAlpha(from_x, from_y));
                    }
                }
            };
            image->Flip(fdHorizontal);
            expect_mirrored(true);
            image->Flip(fdHorizontal);
            ExpectSamePixels(before, *image);
            image->Flip(fdVertical);
            expect_mirrored(false);
            EXPECT_EQ(image->GetAlphaChannelRaw()->GetFull(), is_full);
            image->Flip(fdVertical);
            ExpectSamePixels(before, *image);
        }
    }
}

TEST(Flip, WorksInFilesAndInBorrowedMemory) {
    for (const TFlipDir direction : {fdHorizontal, fdVertical}) {
        const auto image = MakeNoise(zm24RGB, 19, 6, 3);
        TZmBitmap filed;
        filed.SetMinFileSize(0);
        filed.AssignEx(image.get(), /*with_params=*/false);
        image->Flip(direction);
        filed.Flip(direction);
        EXPECT_EQ(filed.GetLocation(), zmFile);
        ExpectSamePixels(*image, filed);
    }
    // Two rows of one pixel, 4 bytes apart; the bytes between are the owner's.
    std::uint8_t memory[] = {1, 2, 3, 77, 4, 5, 6, 78};
    TZmBitmap borrowed;
    borrowed.EncapsulateMemory(memory, 1, 2, zm24RGB, /*do_free_image=*/true, zmboTOPLEFT);
    borrowed.Flip(fdVertical);
    const std::uint8_t exchanged[] = {4, 5, 6, 77, 1, 2, 3, 78};
    EXPECT_TRUE(std::equal(std::begin(memory), std::end(memory), exchanged));
}

TEST(Flip, TellsChangedButNotForNone) {
    const auto image = MakeNoise(zm8g, 3, 3, 1);
    int changes = 0;
    image->SetOnChanged([&changes](void*) { ++changes; });
    image->Flip(fdNone);
    EXPECT_EQ(changes, 0);
    image->Flip(fdHorizontal);
    image->Flip(fdVertical);
    EXPECT_EQ(changes, 2);
    TZmBitmap empty;
    empty.Flip(fdHorizontal);
    EXPECT_TRUE(empty.IsEmpty());
}

}  // namespace
}  // namespace zm::test
