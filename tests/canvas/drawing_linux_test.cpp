#include <gtest/gtest.h>

#include <cstdint>
#include <initializer_list>
#include <limits>
#include <utility>
#include <vector>

#include "engine/foundation/zmstreams.h"
#include "tests/canvas/drawing.h"
#include "tests/support/testmetafile.h"

// What the library below does not do by itself: long miters, and playing enhanced metafiles.
namespace zm::test {
namespace {

TEST(CanvasPen, LongMitersAreCutOrBevelled) {
    // A needle that points to the right at 150; its miter would end beyond 1000, the cut one 50
    // behind the point: 10 times half the width.
    const TZmDPointArray needle = {{20, 28}, {150, 30}, {20, 32}};
    for (const auto& [join, end] :
         {std::pair(zmljMiter, 200), {zmljMiterClipped, 151}, {zmljBevel, 151}, {zmljRound, 155}}) {
        TDrawing drawing(300, 60);
        drawing.zm_canvas->GetPen().SetWidth(10);
        drawing.zm_canvas->GetPen().SetLineJoin(join);
        drawing.zm_canvas->DrawLinesPath(needle);
        EXPECT_NEAR(drawing.InkBounds().right, end, 2) << int{join};
    }
}

/// Drawn at its own size on a picture with ten pixels around it.
void Play(TDrawing& drawing, std::vector<std::uint8_t> bytes, std::int32_t width = 80) {
    TBorrowedMemoryStream stream(bytes.data(), static_cast<std::int32_t>(bytes.size()));
    const TZmMetafile metafile(stream);
    drawing.zm_canvas->Draw(metafile, 10, 10, width, 40);
}

TEST(Metafile, TheHeaderTellsKindAndSize) {
    TMetafileRecorder recorder;
    auto bytes = recorder.Finish();
    TBorrowedMemoryStream stream(bytes.data(), static_cast<std::int32_t>(bytes.size()));
    const TZmMetafile metafile(stream);
    EXPECT_TRUE(metafile.IsEmf());
    EXPECT_FALSE(metafile.IsWmf() || metafile.IsEmfPlus());
    EXPECT_EQ(metafile.GetHeader().width, 80);
    EXPECT_EQ(metafile.GetHeader().height, 40);
    EXPECT_FLOAT_EQ(metafile.GetHeader().dpi_x, 101.6F);  // 4 x 25.4
    EXPECT_EQ(metafile.GetHeader().frame.right, 2000);
    for (const std::int64_t flags : {0, 1}) {
        TMetafileRecorder extended;
        extended.Add(70, {16, 0x2B464D45, 0x4001 | flags << 16, 0, 0});
        bytes = extended.Finish();
        TBorrowedMemoryStream other(bytes.data(), static_cast<std::int32_t>(bytes.size()));
        const TZmMetafile both(other);
        EXPECT_TRUE(both.IsEmfPlus());
        EXPECT_EQ(both.IsEmfPlusDual(), flags == 1);
    }
}

TEST(Metafile, ShapesFollowThePageAndTheRectangle) {
    TDrawing drawing(180, 60);
    TMetafileRecorder recorder;
    recorder.Add(17, {8});  // a page of 800 by 400 from 100, 0, over all 80 by 40 pixels
    recorder.Add(9, {800, 400});
    recorder.Add(10, {100, 0});
    recorder.Add(11, {80, 40});
    recorder.SelectBrush(kRed);
    recorder.Add(43, {100, 0, 310, 110});   // 42 by 11 pixels without the last ones
    Play(drawing, recorder.Finish(), 160);  // twice as wide
    EXPECT_EQ(drawing.CoveredArea(), 41 * 10);
    EXPECT_EQ(drawing.InkBounds().left, 10);
    EXPECT_EQ(drawing.InkBounds().bottom, 20);
    EXPECT_EQ(drawing.PixelAt(12, 12), (TRGBA{0, 0, 255, 255}));
    drawing.zm_canvas->FillRect(TRect{0, 0, 3, 3});
    EXPECT_EQ(drawing.PixelAt(1, 1), (TRGBA{255, 0, 0, 255})) << "the canvas is as it was";
}

TEST(Metafile, StatesClipsAndPathsComeAndGo) {
    TDrawing drawing(100, 60);
    TMetafileRecorder recorder;
    recorder.SelectBrush(0x00FF00);
    recorder.Add(33, {});
    recorder.Add(30, {0, 0, 5, 5});
    recorder.Add(59, {});
    recorder.Add(86, {0, 0, 0, 0, 4, 0, 20, 20 | 20 << 16, 20 << 16});  // a square of 20
    recorder.Add(60, {});
    recorder.Add(62, {0, 0, 0, 0});
    recorder.Add(34, {-1});
    // Up and to the right by a world of two: a triangle of 10 by 10 at 40, 0.
    recorder.Add(35, {0x40000000, 0, 0, 0x40000000, 0x42200000, 0});
    recorder.Add(3, {0, 0, 0, 0, 3, 0, 0, 10, 0, 0, 10});
    Play(drawing, recorder.Finish());
    EXPECT_NEAR(drawing.CoveredArea(), 5 * 5 + 20 * 20 / 2, 2);
    EXPECT_EQ(drawing.PixelAt(14, 14), (TRGBA{0, 255, 0, 255}));
    EXPECT_EQ(drawing.PixelAt(16, 14).a, 0);
    EXPECT_EQ(drawing.PixelAt(52, 12).a, 255);
}

TEST(Metafile, PicturesAndTexts) {
    TDrawing drawing(100, 60);
    TMetafileRecorder recorder;
    // Two by two pixels of 24 bits, bottom row first, over 20 by 20.
    recorder.Add(
        81,
        {0,  0,   0,  0, 0,        0,  0,          0,          2,          2,         80,
         40, 120, 16, 0, 0xCC0020, 20, 20,         40,         2,          2,         1 | 24 << 16,
         0,  16,  0,  0, 0,        0,  0x000000FF, 0x0000FF00, 0x00FF0000, 0x0000FFFF});
    recorder.Add(18, {1});
    recorder.Add(24, {0xFF0000});
    recorder.Add(22, {2 | 24});  // ends at 70, 30, its base line there
    recorder.Add(84,
                 {0, 0, 0, 0, 1, 0, 0, 70, 30, 2, 76, 0, 0, 0, 0, 0, 80, 'H' | 'H' << 16, 15, 15});
    Play(drawing, recorder.Finish());
    EXPECT_EQ(drawing.PixelAt(12, 28), (TRGBA{255, 0, 0, 255}));
    EXPECT_EQ(drawing.PixelAt(28, 28), (TRGBA{0, 0, 255, 255}));
    EXPECT_EQ(drawing.PixelAt(28, 12), (TRGBA{0, 255, 255, 255}));
    const double pictures = 20 * 20;
    EXPECT_GT(drawing.CoveredArea(), pictures + 20);
    const TRect ink = drawing.InkBounds();
    EXPECT_NEAR(ink.right, 80, 3);   // 30 pixels wide by its advances
    EXPECT_NEAR(ink.bottom, 40, 1);  // capitals stand on the line
}

TEST(Metafile, BytesOfAnyKindEndCleanly) {
    TMetafileRecorder recorder;
    recorder.SelectBrush(kRed);
    recorder.Add(17, {8});
    recorder.Add(9, {800, 400});
    recorder.Add(11, {80, 40});
    recorder.Add(38, {2, 1, 3, 0, 0xFF});
    recorder.Add(37, {2});
    recorder.Add(45, {0, 0, 300, 300, 300, 0, 0, 100});
    recorder.Add(90, {0, 0, 0, 0, 2, 4, 2, 2, 5, 6, 7, 8});
    recorder.Add(85, {0, 0, 0, 0, 4, 1, 2, 3, 4});
    recorder.Add(75, {48, 5, 32, 1, 1, 16, 0, 0, 50, 50, 0, 0, 50, 50});
    recorder.Add(81, {0,  0,   0,  0, 0,        0,  0,  0,  2, 2, 80,
                      40, 120, 16, 0, 0xCC0020, 20, 20, 40, 2, 2, 1 | 24 << 16,
                      0,  16,  0,  0, 0,        0,  1,  2,  3, 4});
    recorder.Add(
        84, {0, 0, 0, 0, 1, 0, 0, 70, 30, 2, 76, 6, 0, 0, 50, 50, 80, 'H' | 'H' << 16, 15, 15});
    recorder.Add(108, {10, 10, 2, 0x300, 1, 0, 0, 'a' | 'b' << 8});
    const auto bytes = recorder.Finish();
    TDrawing drawing(100, 60);
    for (std::size_t size = 0; size < bytes.size(); ++size) {
        std::vector<std::uint8_t> cut(bytes.begin(), bytes.begin() + static_cast<int>(size));
        TBorrowedMemoryStream stream(cut.data(), static_cast<std::int32_t>(size));
        EXPECT_EQ(TZmMetafile(stream).GetHandle(), nullptr) << size;
    }
    for (std::size_t place = 0; place + 4 <= bytes.size(); place += 2) {
        for (const std::uint32_t word : {0U, 0x7FFFFFFFU, 0x80000000U, 0xFFFFFFFFU, 0x7F800000U}) {
            auto changed = bytes;
            PutU32LE(changed.data() + place, word);
            Play(drawing, changed);
        }
    }
    Play(drawing, bytes, std::numeric_limits<std::int32_t>::max());
    EXPECT_GT(drawing.CoveredArea(), 0);
}

}  // namespace
}  // namespace zm::test
