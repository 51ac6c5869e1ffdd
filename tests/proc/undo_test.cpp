// The frame of the processing operations: attachment, region, undo and redo.

#include <gtest/gtest.h>

#include <vector>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmresample.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

/// A processor over a 3 by 2 picture of one value.
class ZalmoProcTest : public testing::Test {
protected:
    ZalmoProcTest() : image_(3, 2, zm8g), proc_(&image_) { SetState(0); }

    void SetState(int value) { image_.Fill(value); }
    int State() { return image_.GetPixels_zm8(2, 1); }
    /// An operation: saves the state and makes a new one.
    void Change(int value) {
        proc_.SaveUndo(u"to " + std::u16string(1, static_cast<char16_t>(u'0' + value)), zmuImage,
                       /*clear_redo=*/true, value);
        SetState(value);
    }

    TZmBitmap image_;
    TZalmoProc proc_;
};

TEST_F(ZalmoProcTest, DefaultsFollowTheOwner) {
    EXPECT_TRUE(TZalmoProc(/*has_owner=*/true).GetAutoUndo());
    EXPECT_FALSE(TZalmoProc(/*has_owner=*/false).GetAutoUndo());
    EXPECT_FALSE(proc_.GetAutoUndo());
    EXPECT_EQ(proc_.GetUndoLimit(), 1);
    EXPECT_EQ(proc_.GetUndoLocation(), zmFile);
    EXPECT_TRUE(proc_.GetAutoConvertFormat());
    TZalmoProc own(/*has_owner=*/false);
    ASSERT_NE(own.GetAttachedZmBitmap(), nullptr);
    own.SetAttachedZmBitmap(&image_);
    EXPECT_EQ(own.GetAttachedZmBitmap(), &image_);
}

TEST_F(ZalmoProcTest, UndoBringsTheStateBackWithItsCaption) {
    for (const TZmLocation location : {zmFile, zmMemory}) {
        proc_.ClearAllUndo();
        proc_.SetUndoLocation(location);
        SetState(1);
        image_.SetAlpha(0, 0, 17);
        Change(2);
        image_.RemoveAlphaChannel(false, 0);
        ASSERT_NE(proc_.GetUndoInfo(0), nullptr);
        EXPECT_EQ(proc_.GetUndoInfo(0)->Caption, u"to 2");
        EXPECT_EQ(proc_.GetUndoInfo(0)->Operation, 2);
        EXPECT_EQ(proc_.GetUndoInfo(0)->Source, zmuImage);
        EXPECT_EQ(proc_.GetUndoInfo(0)->LayerIndex, -1);
        EXPECT_EQ(proc_.GetUndoInfo(1), nullptr);
        proc_.Undo(/*auto_redo=*/false);
        EXPECT_EQ(State(), 1);
        EXPECT_EQ(image_.GetAlpha(0, 0), 17);
        EXPECT_EQ(image_.GetLocation(), zmMemory) << "the image keeps its own place";
        EXPECT_EQ(proc_.GetUndoCount(), 1) << "stays until ClearUndo";
        proc_.ClearUndo();
        EXPECT_EQ(proc_.GetUndoCount(), 0);
    }
}

TEST_F(ZalmoProcTest, LimitDropsTheOldest) {
    Change(1);
    Change(2);
    EXPECT_EQ(proc_.GetUndoCount(), 1);
    EXPECT_EQ(proc_.GetUndoInfo(0)->Caption, u"to 2");
    proc_.SetUndoLimit(2);
    Change(3);
    Change(4);
    EXPECT_EQ(proc_.GetUndoCount(), 2);
    EXPECT_EQ(proc_.GetUndoInfo(1)->Caption, u"to 3");
    proc_.SetUndoLimit(0);
    int saves = 0;
    proc_.SetOnSaveUndo([&](void*, TZmUndoSource) { ++saves; });
    Change(5);
    EXPECT_EQ(proc_.GetUndoCount(), 2);
    EXPECT_EQ(saves, 0);
}

TEST_F(ZalmoProcTest, ImagesOfOneRowOrColumnAreNotSaved) {
    for (const auto& [width, height] : {std::pair{1, 1}, std::pair{1, 5}, std::pair{5, 1}}) {
        TZmBitmap thin(width, height, zm8g);
        thin.Fill(9);
        TZalmoProc proc(&thin);
        proc.SetAutoUndo(true);
        proc.Resample(4, 4, rfBilinear, false);
        EXPECT_EQ(proc.GetUndoCount(), 0);
        EXPECT_EQ(thin.GetWidth(), 4) << "the operation runs on";
        EXPECT_EQ(thin.GetPixels_zm8(3, 3), 9);
    }
}

TEST_F(ZalmoProcTest, SourcesOfViewersSaveNothing) {
    std::vector<TZmUndoSource> seen;
    proc_.SetOnSaveUndo([&](void* sender, TZmUndoSource source) {
        EXPECT_EQ(sender, &proc_);
        seen.push_back(source);
    });
    proc_.SaveUndo(zmuSelection, true);
    proc_.SaveUndo(zmuImage, true);
    EXPECT_EQ(proc_.GetUndoCount(), 1);
    EXPECT_EQ(seen, (std::vector<TZmUndoSource>{zmuSelection, zmuImage}));
}

TEST_F(ZalmoProcTest, UndoAndRedoWalkThroughTime) {
    proc_.SetUndoLimit(5);
    Change(1);
    Change(2);
    Change(3);
    int events = 0;
    proc_.SetOnUndoRedoEvent([&](void*) { ++events; });
    proc_.Undo(true);
    EXPECT_EQ(State(), 2);
    EXPECT_EQ(proc_.GetRedoInfo(0)->Caption, u"to 3");
    proc_.UndoAt(1, true);  // two steps at once
    EXPECT_EQ(State(), 0);
    EXPECT_EQ(proc_.GetUndoCount(), 0);
    ASSERT_EQ(proc_.GetRedoCount(), 3);
    EXPECT_EQ(proc_.GetRedoInfo(0)->Caption, u"to 1");
    EXPECT_EQ(proc_.GetRedoInfo(2)->Caption, u"to 3");
    proc_.Redo(true);
    EXPECT_EQ(State(), 1);
    proc_.RedoAt(1, true);
    EXPECT_EQ(State(), 3);
    EXPECT_EQ(proc_.GetUndoCount(), 3);
    EXPECT_EQ(proc_.GetRedoCount(), 0);
    EXPECT_EQ(proc_.GetUndoInfo(0)->Caption, u"to 3");
    EXPECT_EQ(events, 4);
    proc_.UndoAt(2, true);
    EXPECT_EQ(State(), 0);
}

TEST_F(ZalmoProcTest, PositionsOutsideDoNothing) {
    Change(1);
    for (const std::int32_t position : {1, 7, -1}) {
        proc_.UndoAt(position, true);
        proc_.ClearUndoAt(position);
        proc_.RedoAt(position, true);
        proc_.ClearRedoAt(position);
    }
    proc_.Redo(true);
    EXPECT_EQ(State(), 1);
    EXPECT_EQ(proc_.GetUndoCount(), 1);
    EXPECT_EQ(proc_.GetRedoCount(), 0);
}

TEST_F(ZalmoProcTest, NewOperationClearsRedoWhenAsked) {
    proc_.SetUndoLimit(5);
    Change(1);
    proc_.Undo(true);
    EXPECT_EQ(proc_.GetRedoCount(), 1);
    proc_.SaveUndo(u"kept", zmuImage, /*clear_redo=*/false, 7);
    EXPECT_EQ(proc_.GetRedoCount(), 1);
    Change(2);
    EXPECT_EQ(proc_.GetRedoCount(), 0);
    proc_.SaveRedo(u"by hand", zmuImage, 9);
    EXPECT_EQ(proc_.GetRedoInfo(0)->Operation, 9);
    proc_.ClearRedo();
    EXPECT_EQ(proc_.GetRedoCount(), 0);
}

TEST_F(ZalmoProcTest, UndoRectRestoresAPart) {
    Change(8);
    proc_.UndoRect(1, 0, 99, 0);
    EXPECT_EQ(image_.GetPixels_zm8(0, 0), 8);
    EXPECT_EQ(image_.GetPixels_zm8(1, 0), 0);
    EXPECT_EQ(image_.GetPixels_zm8(2, 0), 0);
    EXPECT_EQ(image_.GetPixels_zm8(2, 1), 8);
    proc_.UndoRect(-5, 1, 0, 1);
    EXPECT_EQ(image_.GetPixels_zm8(0, 1), 0);
    EXPECT_EQ(image_.GetPixels_zm8(1, 1), 8);
}

TEST_F(ZalmoProcTest, RegionIsTheSelectionOrTheWholeBitmap) {
    const auto expect_region = [this](bool is_selected, const std::vector<std::int32_t>& wanted) {
        std::vector<std::int32_t> region(4);
        TZmMask* mask = nullptr;
        EXPECT_EQ(proc_.GetReSel(region[0], region[1], region[2], region[3], mask), is_selected);
        EXPECT_EQ(region, wanted);
    };
    expect_region(false, {0, 0, 3, 2});
    proc_.Select({1, 0, 2, 2});
    expect_region(true, {1, 0, 2, 2});
    proc_.Select({-4, -4, 99, 99});
    expect_region(true, {0, 0, 3, 2});
    for (const TRect& empty : {TRect{2, 0, 2, 2}, TRect{2, 2, 1, 1}}) {
        proc_.Select(empty);
        expect_region(false, {0, 0, 3, 2});
    }
    proc_.Select({1, 0, 2, 2});
    proc_.Deselect();
    expect_region(false, {0, 0, 3, 2});
}

TEST_F(ZalmoProcTest, BeginConvertsOrRefusesAndSavesFirst) {
    std::int32_t x1, y1, x2, y2;
    TZmBitmap* bitmap = nullptr;
    proc_.SetAutoConvertFormat(false);
    EXPECT_FALSE(
        proc_.BeginImageProcessing(TZmPixelFormatSet(zm24RGB), x1, y1, x2, y2, u"op", bitmap, 5));
    EXPECT_EQ(image_.GetPixelFormat(), zm8g);
    proc_.SetAutoConvertFormat(true);
    proc_.SetAutoUndo(true);
    EXPECT_TRUE(
        proc_.BeginImageProcessing(TZmPixelFormatSet(zm24RGB), x1, y1, x2, y2, u"op", bitmap, 5));
    EXPECT_EQ(bitmap, &image_);
    EXPECT_EQ(x2, 3);
    EXPECT_EQ(y2, 2);
    EXPECT_EQ(image_.GetPixelFormat(), zm24RGB);
    int changes = 0;
    image_.SetOnChanged([&](void*) { ++changes; });
    proc_.EndImageProcessing(bitmap);
    EXPECT_EQ(changes, 1);
    proc_.Undo(false);
    EXPECT_EQ(image_.GetPixelFormat(), zm8g) << "the state before the conversion";
    TZmMask* mask = nullptr;
    EXPECT_TRUE(proc_.BeginImageAnalysis(TZmPixelFormatSet(), x1, y1, x2, y2, bitmap, mask));
    EXPECT_EQ(mask, nullptr);
    proc_.EndImageAnalysis(bitmap);
    EXPECT_EQ(proc_.GetUndoCount(), 1) << "analysis saves nothing";
}

TEST_F(ZalmoProcTest, MissingBitmapIsRefusedWithTheFramesText) {
    proc_.SetAttachedZmBitmap(nullptr);
    std::int32_t x1, y1, x2, y2;
    TZmBitmap* bitmap = nullptr;
    try {
        proc_.BeginImageProcessing(TZmPixelFormatSet(), x1, y1, x2, y2, u"op", bitmap, 5);
        FAIL() << "no exception";
    } catch (const EZmException& error) {
        EXPECT_STREQ(error.what(), "Active layer does not contain bitmap");
    }
    TZmMask* mask = nullptr;
    EXPECT_THROW(proc_.BeginImageAnalysis(TZmPixelFormatSet(), x1, y1, x2, y2, bitmap, mask),
                 EZmException);
    EXPECT_NO_THROW(proc_.Update());
    EXPECT_NO_THROW(proc_.SaveUndo(zmuImage, true));
    EXPECT_NO_THROW(proc_.Undo(true));
}

/// A selection by mask on a picture of 4 by 3 pixels whose values are 10 * y + x.
class MaskSelectionTest : public testing::Test {
protected:
    MaskSelectionTest() : image_(4, 3, zm8g), proc_(&image_) {
        for (std::int32_t y = 0; y < 3; ++y) {
            for (std::int32_t x = 0; x < 4; ++x) {
                image_.SetPixels_zm8(x, y, static_cast<std::uint8_t>(10 * y + x));
            }
        }
        // Feathered: columns 1 to 3, rows 1 and 2.
        EXPECT_TRUE(mask_.AllocateBits(4, 3, 8));
        mask_.SetPixel(1, 1, 255);
        mask_.SetPixel(2, 1, 128);
        mask_.SetPixel(3, 2, 51);
    }

    /// Fills the region that the frame hands out, pixels and the alpha of the copy.
    void FillRegion(int value, int alpha) {
        TZmMask* mask = nullptr;
        ASSERT_TRUE(proc_.BeginImageProcessing(TZmPixelFormatSet(), x1_, y1_, x2_, y2_, u"fill",
                                               region_, mask, 5));
        ASSERT_NE(region_, &image_);
        size_ = TZmImageSize{region_->GetWidth(), region_->GetHeight()};
        corner_ = region_->GetPixels_zm8(0, 0);
        region_->Fill(value);
        if (alpha >= 0) {
            region_->SetAlpha(0, 0, static_cast<std::uint8_t>(alpha));
        }
        proc_.EndImageProcessing(region_, mask);
    }
    std::vector<int> Values() {
        std::vector<int> values;
        for (std::int32_t i = 0; i < 12; ++i) {
            values.push_back(image_.GetPixels_zm8(i % 4, i / 4));
        }
        return values;
    }

    TZmBitmap image_;
    TZalmoProc proc_;
    TZmMask mask_;
    std::int32_t x1_ = -1, y1_ = -1, x2_ = -1, y2_ = -1;
    TZmBitmap* region_ = nullptr;
    TZmImageSize size_;
    int corner_ = -1;
};

TEST_F(MaskSelectionTest, OperationWorksOnTheBoxAndGoesBackThroughTheMask) {
    proc_.SelectMask(mask_);
    mask_.Empty();  // a copy was taken
    FillRegion(211, -1);
    EXPECT_EQ((std::vector{x1_, y1_, x2_, y2_}), (std::vector{0, 0, 3, 2}));
    EXPECT_EQ(size_.width, 3);
    EXPECT_EQ(size_.height, 2);
    EXPECT_EQ(corner_, 11);
    // 12 and 211 by 128/255: 111.9; 23 and 211 by 51/255: 60.6
    EXPECT_EQ(Values(), (std::vector{0, 1, 2, 3, 10, 211, 112, 13, 20, 21, 22, 61}));
    EXPECT_FALSE(image_.HasAlphaChannel());
}

TEST_F(MaskSelectionTest, AlphaGoesBackOnlyWhereItIsNotFull) {
    proc_.SelectMask(mask_);
    TZmBitmap* const plane = image_.GetAlphaChannel();
    plane->SyncFull();
    ASSERT_TRUE(plane->GetFull());
    FillRegion(211, -1);
    EXPECT_TRUE(plane->GetFull()) << "nothing to write";
    FillRegion(211, 100);
    EXPECT_FALSE(plane->GetFull());
    EXPECT_EQ(image_.GetAlpha(1, 1), 100);
    EXPECT_EQ(image_.GetAlpha(2, 1), 255);
    EXPECT_EQ(image_.GetAlpha(0, 0), 255);
    image_.SetAlpha(2, 1, 7);
    TZmMask* mask = nullptr;
    ASSERT_TRUE(proc_.BeginImageAnalysis(TZmPixelFormatSet(), x1_, y1_, x2_, y2_, region_, mask));
    EXPECT_EQ(region_->GetAlpha(1, 0), 7) << "the copy has the alpha of its place";
    region_->Fill(1);
    proc_.EndImageAnalysis(region_);
    EXPECT_EQ(image_.GetPixels_zm8(1, 1), 211) << "an analysis changes nothing";
}

TEST_F(MaskSelectionTest, MasksBesideTheImageAndEmptyOnes) {
    TZmMask wide;
    ASSERT_TRUE(wide.AllocateBits(100, 100, 1));
    wide.SetPixel(3, 2, 1);
    wide.SetPixel(90, 90, 1);
    proc_.SelectMask(wide);
    FillRegion(200, -1);
    EXPECT_EQ(size_.width, 1) << "the box ends with the image";
    EXPECT_EQ(image_.GetPixels_zm8(3, 2), 200);
    EXPECT_EQ(image_.GetPixels_zm8(2, 2), 22);
    TZmMask beside;
    ASSERT_TRUE(beside.AllocateBits(9, 9, 8));
    beside.SetPixel(4, 0, 255);
    proc_.SelectMask(beside);
    TZmMask* mask = nullptr;
    EXPECT_FALSE(proc_.BeginImageProcessing(TZmPixelFormatSet(), x1_, y1_, x2_, y2_, u"fill",
                                            region_, mask, 5));
    proc_.EndImageProcessing(region_, mask);
    beside.Empty();
    proc_.SelectMask(beside);
    EXPECT_FALSE(proc_.GetReSel(x1_, y1_, x2_, y2_, mask));
    EXPECT_EQ(mask, nullptr);
    EXPECT_EQ(x2_, 4);
}

TEST_F(MaskSelectionTest, OperationsWithoutSelectionsWorkOnTheImage) {
    proc_.SelectMask(mask_);
    ASSERT_TRUE(
        proc_.BeginImageProcessing(TZmPixelFormatSet(), x1_, y1_, x2_, y2_, u"text", region_, 5));
    EXPECT_EQ(region_, &image_);
    proc_.EndImageProcessing(region_);
    proc_.Resample(2, 2, rfNone, false);
    EXPECT_EQ(image_.GetWidth(), 2);
}

}  // namespace
}  // namespace zm::test
