#include <gtest/gtest.h>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

TEST(AlphaPlane, ComesOpaqueAtTheFirstQuestion) {
    TZmBitmap bitmap(3, 2, zm24RGB);
    EXPECT_FALSE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 255);
    EXPECT_EQ(bitmap.GetAlphaChannelRaw(), nullptr);
    TZmBitmap* const plane = bitmap.GetAlphaChannel();
    ASSERT_NE(plane, nullptr);
    EXPECT_EQ(plane->GetPixelFormat(), zm8g);
    EXPECT_EQ(plane->GetPixels_zm8(2, 1), 255);
    EXPECT_TRUE(plane->GetIsAlpha());
    EXPECT_FALSE(plane->GetFull());
    plane->SyncFull();
    EXPECT_TRUE(plane->GetFull());
    EXPECT_EQ(plane->GetAlphaChannel(), nullptr);  // a plane never gets one
    plane->AlphaFill(3);
    EXPECT_FALSE(plane->HasAlphaChannel());
}

TEST(AlphaPlane, SyncFullFindsTheLastPixelOnly) {
    TZmBitmap bitmap(5, 3, zm24RGB);
    bitmap.AlphaFill(255);
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.SetAlpha(4, 2, 254);
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.GetAlphaChannelRaw()->SetFull(true);
    bitmap.GetAlphaChannelRaw()->SyncFull();
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
    bitmap.AlphaFill(254);
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 254);
    bitmap.Fill(static_cast<double>(0x00FFFFFF));
    bitmap.SyncFull();  // an image by the bytes of its pixels
    EXPECT_TRUE(bitmap.GetFull());
    bitmap.SetPixels_zm24RGB(4, 2, TRGB{255, 255, 254});
    bitmap.SyncFull();
    EXPECT_FALSE(bitmap.GetFull());
}

TEST(AlphaPlane, MergesWithTheBackground) {
    struct TCase {
        std::uint8_t pixel, background, alpha, result;
    };
    // (((pixel - background) * alpha * 1024) >> 18) + background
    constexpr TCase kCases[] = {
        {200, 100, 0, 100},    // nothing of the pixel
        {200, 100, 255, 199},  // (100 * 261120) >> 18 = 99
        {100, 200, 255, 100},  // (-100 * 261120) >> 18 = -100: the shift goes down
        {200, 100, 128, 150},  // (100 * 131072) >> 18 = 50
        {0, 255, 1, 254},      // (-255 * 1024) >> 18 = -1
    };
    for (const TCase& test : kCases) {
        TZmBitmap bitmap(1, 1, zm24RGB);
        bitmap.SetPixels_zm24RGB(0, 0, TRGB{test.pixel, test.pixel, test.pixel});
        bitmap.SetAlpha(0, 0, test.alpha);
        bitmap.RemoveAlphaChannel(true, test.background * 0x010101);
        EXPECT_FALSE(bitmap.HasAlphaChannel());
        EXPECT_EQ(bitmap.GetPixels_zm24RGB(0, 0), (TRGB{test.result, test.result, test.result}));
    }
    for (const TZmPixelFormat format : {zm24RGB, zm8g}) {  // others keep their pixels
        TZmBitmap bitmap(2, 1, format);
        bitmap.Fill(0.0);
        bitmap.AlphaFill(0);
        bitmap.RemoveAlphaChannel(true, 0x00302010);
        EXPECT_FALSE(bitmap.HasAlphaChannel());
        EXPECT_EQ(bitmap.GetPixels(1, 0), format == zm24RGB ? (TRGB{0x30, 0x20, 0x10}) : TRGB{});
    }
}

TEST(AlphaPlane, IsReplacedAndDetached) {
    TZmBitmap bitmap(2, 2, zm24RGB);
    int calls = 0;
    bitmap.SetOnChanged([&calls](void*) { ++calls; });
    EXPECT_EQ(bitmap.DetachAlphaChannel(false), nullptr);
    auto plane = bitmap.DetachAlphaChannel(true);
    ASSERT_NE(plane, nullptr);
    EXPECT_FALSE(bitmap.HasAlphaChannel());
    plane->SetPixels_zm8(1, 1, 7);
    bitmap.ReplaceAlphaChannel(std::move(plane));
    EXPECT_EQ(bitmap.GetAlpha(1, 1), 7);
    auto foreign = std::make_unique<TZmBitmap>(2, 2, zm8g);
    foreign->Fill(3.0);
    foreign->GetAlphaChannel();
    bitmap.ReplaceAlphaChannel(std::move(foreign));
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 3);
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetIsAlpha());
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->HasAlphaChannel());
    EXPECT_EQ(calls, 4);
}

TEST(AlphaPlane, OfAnotherSizeIsNotReadOutside) {
    TZmBitmap bitmap(20, 10, zm24RGB);
    bitmap.Fill(static_cast<double>(0x00FFFFFF));
    bitmap.ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(3, 2, zmMemory));
    bitmap.GetAlphaChannelRaw()->Fill(0.0);
    EXPECT_EQ(bitmap.GetAlpha(2, 1), 0);
    EXPECT_EQ(bitmap.GetAlpha(3, 1), 255);
    EXPECT_EQ(bitmap.GetAlpha(2, 2), 255);
    bitmap.SetAlpha(19, 9, 1);
    TZmMask mask;
    bitmap.CopyToTZmMask(mask);
    EXPECT_EQ(mask.GetPixel(2, 1), 0);
    EXPECT_EQ(mask.GetPixel(19, 9), 255);
    TZmBitmap copy(bitmap);
    copy.SynchronizeRGBA(false, true);
    EXPECT_EQ(copy.GetPixels_zm32RGB(2, 1).a, 0);
    EXPECT_EQ(copy.GetPixels_zm32RGB(19, 9).a, 255);
    bitmap.RemoveAlphaChannel(true, 0);
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(2, 1).g, 0);
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(3, 1).g, 255);
}

TEST(AlphaPlane, MovesToTheFourthByteAndBack) {
    TZmBitmap bitmap(2, 1, zm24RGB);
    bitmap.Fill(5.0);
    bitmap.SetAlpha(1, 0, 40);
    bitmap.SynchronizeRGBA(false, true);
    ASSERT_EQ(bitmap.GetPixelFormat(), zm32RGB);
    EXPECT_EQ(bitmap.GetPixels_zm32RGB(0, 0), (TRGBA{0, 0, 5, 255}));
    EXPECT_EQ(bitmap.GetPixels_zm32RGB(1, 0), (TRGBA{0, 0, 5, 40}));
    bitmap.RemoveAlphaChannel(false, 0);
    bitmap.SynchronizeRGBA(true, true);
    EXPECT_EQ(bitmap.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(bitmap.GetAlpha(1, 0), 40);
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
    TZmBitmap opaque(2, 1, zm32RGB);
    opaque.Fill(0.0);
    opaque.SynchronizeRGBA(true, false);
    EXPECT_EQ(opaque.GetPixelFormat(), zm32RGB);
    EXPECT_TRUE(opaque.GetAlphaChannelRaw()->GetFull());
}

TEST(AlphaPlane, ComesFromMasksOfBothDepths) {
    for (const std::int32_t depth : {1, 8}) {
        TZmMask mask;
        ASSERT_TRUE(mask.AllocateBits(10, 3, depth));
        mask.SetPixel(9, 2, 255);
        TZmBitmap bitmap(10, 3, zm8g);
        bitmap.CopyFromTZmMask(mask);
        EXPECT_EQ(bitmap.GetAlpha(9, 2), 255);
        EXPECT_EQ(bitmap.GetAlpha(8, 2), 0);
        EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
        TZmMask back;
        bitmap.CopyToTZmMask(back);
        EXPECT_EQ(back.GetX1(), 9);
        EXPECT_EQ(back.GetY1(), 2);
        EXPECT_FALSE(back.GetFull());
        mask.Fill(255);
        bitmap.CopyFromTZmMask(mask);
        EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetFull());
    }
}

}  // namespace
}  // namespace zm::test
