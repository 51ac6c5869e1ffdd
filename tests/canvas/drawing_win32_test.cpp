#include <gtest/gtest.h>

#include <windows.h>

#include <cmath>
#include <set>
#include <vector>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/platform/drawing.h"

// What the system's own drawing does not do by itself: far shapes, long texts, single bits.
namespace zm::platform {
namespace {

constexpr TArgb kOpaqueWhite = 0xFFFFFFFF;
constexpr float kFarEnd = 2147483648.0F;
const TDrawFont kFont{.family = u"Liberation Sans", .height = -12};

class TDrawingTest : public testing::Test {
protected:
    void SetUp() override {
        ASSERT_TRUE(bitmap_.SetSize(40, 30, pf32bit));
        ASSERT_TRUE(BindVectorGraphics(TLibraryLoading::kAllowed));
        graphics_ = CreateVectorGraphics(bitmap_.GetDrawTarget());
        ASSERT_NE(graphics_, nullptr);
        brush_ = CreateVectorBrush({vbSolid, kOpaqueWhite, 0, 0, {}, {}});
        pen_ = CreateVectorPen({.color = kOpaqueWhite});
    }
    void TearDown() override {
        pen_.reset();
        brush_.reset();
        graphics_.reset();
        UnbindVectorGraphics(TUnbinding::kCounted);
    }
    std::uint32_t PixelAt(std::int32_t x, std::int32_t y) {
        graphics_->Flush();
        const std::uint8_t* bytes = bitmap_.GetScanLine(y) + x * 4;
        return static_cast<std::uint32_t>(bytes[0] | bytes[1] << 8 | bytes[2] << 16) |
               static_cast<std::uint32_t>(bytes[3]) << 24;
    }

    TBitmap bitmap_;
    std::unique_ptr<TVectorGraphics> graphics_;
    std::unique_ptr<TVectorBrush> brush_;
    std::unique_ptr<TVectorPen> pen_;
};

TEST_F(TDrawingTest, FarShapesShowTheirNearParts) {
    // A disc so large that its left end at x = 20 is a straight edge here.
    EXPECT_TRUE(graphics_->FillEllipse(*brush_, {20, 15 - 1e8F, 2e8F, 2e8F}));
    EXPECT_EQ(PixelAt(19, 15), 0U);
    EXPECT_EQ(PixelAt(21, 15), kOpaqueWhite);
    // y = x / 2 from end to end.
    EXPECT_TRUE(graphics_->DrawLine(*pen_, {-kFarEnd, -kFarEnd / 2}, {kFarEnd, kFarEnd / 2}));
    EXPECT_EQ(PixelAt(8, 4), kOpaqueWhite);
    EXPECT_EQ(PixelAt(4, 8), 0U);
    EXPECT_TRUE(graphics_->FillRectangle(*brush_, {-kFarEnd, 25, 2 * kFarEnd, kFarEnd}));
    EXPECT_EQ(PixelAt(0, 24), 0U);
    EXPECT_EQ(PixelAt(0, 25), kOpaqueWhite);
    EXPECT_FALSE(graphics_->DrawLine(*pen_, {NAN, 0}, {5, 5}));
}

TEST_F(TDrawingTest, FarPathsFollowTheTransform) {
    graphics_->TranslateTransform(10, 0);
    graphics_->ScaleTransform(2, 1);
    TDrawPath path(2);
    path[0].to = path[1].from = {1e9F, 0};
    path[0].from = {0, -1e9F};
    path[1].to = {0, 1e9F};
    EXPECT_TRUE(graphics_->FillPath(*brush_, path));
    EXPECT_EQ(PixelAt(9, 10), 0U);
    EXPECT_EQ(PixelAt(10, 10), kOpaqueWhite);
}

TEST_F(TDrawingTest, LongTextsHaveTheLinesOfShortOnes) {
    const auto line = graphics_->MeasureString(u"word", kFont, {}, {});
    ASSERT_TRUE(line);
    // As wide as a word and a half: one word a line, in one piece and in many.
    const TDrawRect column{0, 0, line->width * 1.5F, 0};
    std::u16string words;
    for (int count = 1; count <= 2000; ++count) {
        words += u"word ";
        if (count == 10 || count == 2000) {
            const auto size = graphics_->MeasureString(words, kFont, {}, column);
            ASSERT_TRUE(size);
            EXPECT_FLOAT_EQ(size->height, line->height * static_cast<float>(count)) << count;
        }
    }
    const std::u16string ends(1000, u'\n');
    const auto size = graphics_->MeasureString(u"word" + ends + u"word", kFont, {}, {});
    ASSERT_TRUE(size);
    EXPECT_FLOAT_EQ(size->height, line->height * 1001);
}

TEST_F(TDrawingTest, SingleBitTextIsAllOrNothing) {
    constexpr TArgb kHalfRed = 0x80FF0000;
    graphics_->SetTextRenderingHint(1);
    graphics_->RotateTransform(10);
    EXPECT_TRUE(graphics_->DrawString(u"Agx", kFont, {}, {2, 2, 0, 0}, kHalfRed));
    std::set<std::uint32_t> values;
    for (std::int32_t index = 0; index < 40 * 30; ++index) {
        values.insert(PixelAt(index % 40, index / 40));
    }
    EXPECT_EQ(values, (std::set<std::uint32_t>{0, kHalfRed}));
}

/// A metafile of 1000 by 500 hundredths of a millimetre that is black all over.
std::vector<std::uint8_t> BlackMetafile() {
    const RECT frame{0, 0, 1000, 500};
    const HDC record = ::CreateEnhMetaFileW(nullptr, nullptr, &frame, nullptr);
    ::SelectObject(record, ::GetStockObject(BLACK_BRUSH));
    ::Rectangle(record, 0, 0, 2000, 2000);
    const HENHMETAFILE metafile = ::CloseEnhMetaFile(record);
    std::vector<std::uint8_t> bytes(::GetEnhMetaFileBits(metafile, 0, nullptr));
    ::GetEnhMetaFileBits(metafile, static_cast<UINT>(bytes.size()), bytes.data());
    ::DeleteEnhMetaFile(metafile);
    return bytes;
}

TEST_F(TDrawingTest, MetafilesFillTheirRectangle) {
    graphics_->FillRectangle(*brush_, {0, 0, 40, 30});
    const auto metafile = CreateMetafile(BlackMetafile());
    ASSERT_NE(metafile, nullptr);
    EXPECT_EQ(metafile->Header().type, 3);
    EXPECT_EQ(metafile->Header().frame.right, 1000);
    EXPECT_EQ(metafile->Header().frame.bottom, 500);
    EXPECT_TRUE(graphics_->DrawMetafile(*metafile, {10, 10, 20, 10}));
    EXPECT_EQ(PixelAt(20, 15), 0xFF000000U);
    EXPECT_EQ(PixelAt(8, 15), kOpaqueWhite);
    EXPECT_EQ(PixelAt(20, 22), kOpaqueWhite);
    EXPECT_FALSE(graphics_->DrawMetafile(*metafile, {0, 0, kFarEnd, kFarEnd}));
}

TEST_F(TDrawingTest, CutMetafilesAreRefused) {
    const std::vector<std::uint8_t> bytes = BlackMetafile();
    for (std::size_t size = 0; size < bytes.size(); ++size) {
        EXPECT_EQ(CreateMetafile({bytes.data(), size}), nullptr) << size;
    }
}

/// The system gives a process no more than 16384 objects: one that is left behind each time ends
/// the drawing.
TEST_F(TDrawingTest, PlainDrawingLeavesNoObjects) {
    const auto plain = CreatePlatformCanvas(bitmap_.GetDrawTarget());
    ASSERT_NE(plain, nullptr);
    for (int round = 0; round < 17000; ++round) {
        plain->FillRect({.color = 0}, {0, 0, 2, 2});
        plain->TextExtent(u"", kFont);
    }
    plain->FillRect({.color = 0x0000FF}, {0, 0, 1, 1});
    EXPECT_EQ(PixelAt(0, 0), 0x00FF0000U);
    EXPECT_GT(plain->TextExtent(u"word", kFont).x, 0);
}

}  // namespace
}  // namespace zm::platform
