// The frame of the processing operations: attachment, region, undo and redo.

#include <gtest/gtest.h>

#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/proc/zalmoproc.h"
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

TEST_F(ZalmoProcTest, SizeAndFormatComeBackToo) {
    proc_.SetAutoUndo(true);
    proc_.Resample(9, 9, rfLanczos3, false);
    image_.SetPixelFormat(zm24RGB);
    EXPECT_EQ(proc_.GetUndoInfo(0)->Operation, kOperationResample);
    EXPECT_EQ(proc_.GetUndoInfo(0)->Caption, OperationCaption(kOperationResample));
    EXPECT_FALSE(proc_.GetUndoInfo(0)->Caption.empty());
    proc_.Undo(false);
    EXPECT_EQ(image_.GetWidth(), 3);
    EXPECT_EQ(image_.GetPixelFormat(), zm8g);
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
    struct TSelectionCase {
        TRect asked;
        bool selected;
        TRect region;
    };
    for (const TSelectionCase& test : {TSelectionCase{{1, 0, 2, 2}, true, {1, 0, 2, 2}},
                                       TSelectionCase{{-4, -4, 99, 99}, true, {0, 0, 3, 2}},
                                       TSelectionCase{{2, 0, 2, 2}, false, {0, 0, 3, 2}},
                                       TSelectionCase{{2, 2, 1, 1}, false, {0, 0, 3, 2}}}) {
        proc_.Select(test.asked);
        TRect region;
        EXPECT_EQ(proc_.GetReSel(region.left, region.top, region.right, region.bottom),
                  test.selected);
        EXPECT_EQ(region.left, test.region.left);
        EXPECT_EQ(region.top, test.region.top);
        EXPECT_EQ(region.right, test.region.right);
        EXPECT_EQ(region.bottom, test.region.bottom);
    }
    proc_.Deselect();
    TRect region;
    EXPECT_FALSE(proc_.GetReSel(region.left, region.top, region.right, region.bottom));
}

TEST_F(ZalmoProcTest, BeginConvertsOrRefusesAndSavesFirst) {
    std::int32_t x1, y1, x2, y2;
    TZmBitmap* bitmap = nullptr;
    proc_.SetAutoConvertFormat(false);
    EXPECT_FALSE(proc_.BeginImageProcessing(TZmPixelFormatSet(zm24RGB), x1, y1, x2, y2, u"op",
                                            bitmap, 5));
    EXPECT_EQ(image_.GetPixelFormat(), zm8g);
    proc_.SetAutoConvertFormat(true);
    proc_.SetAutoUndo(true);
    EXPECT_TRUE(proc_.BeginImageProcessing(TZmPixelFormatSet(zm24RGB), x1, y1, x2, y2, u"op",
                                           bitmap, 5));
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
    EXPECT_TRUE(proc_.BeginImageAnalysis(TZmPixelFormatSet(), x1, y1, x2, y2, bitmap));
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
    EXPECT_THROW(proc_.BeginImageAnalysis(TZmPixelFormatSet(), x1, y1, x2, y2, bitmap),
                 EZmException);
    EXPECT_NO_THROW(proc_.Update());
    EXPECT_NO_THROW(proc_.SaveUndo(zmuImage, true));
    EXPECT_NO_THROW(proc_.Undo(true));
}

}  // namespace
}  // namespace zm::test
