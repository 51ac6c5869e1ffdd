/// The raw form of a bitmap: a blob written by hand, what the writer makes of an image, and blobs
/// that no bitmap has written.

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <vector>

#include "engine/bitmap/zmrawblob.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstreams.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

/// 3 by 2 pixels of zm8g, rows of four bytes, with a plane.
const std::vector<std::uint8_t> kBlob = {
    'T',  'Z',  'M',  'B',  'I',  'T',  'M',  'A',  'P', 'R', 'A', 'W',  //
    0,    0,    0,    0,                                                 // 12 version
    0,    0,    0,    0,                                                 // 16 no palette
    3,    0,    0,    0,                                                 // 20 width
    2,    0,    0,    0,                                                 // 24 height
    3,                                                                   // 28 zm8g
    0,                                                                   // 29 not full
    16,   0,    0,    0,                                                 // 30 palette used
    0,    0,    0,    0,    0,    0,    0x24, 0x40,                      // 34 black, 10.0
    0,    0,    0,    0,    0,    0,    0x34, 0x40,                      // 42 white, 20.0
    1,    0,    0,    0,    0xFE, 0xFF, 0xFF, 0xFF, 3,   0,   0,   0,
    4,    0,    0,    0,                          // 50 offsets 1, -2, 3, 4
    1,                                            // 66 offsets enabled
    0xFB, 0xFF, 0xFF, 0xFF,                       // 67 contrast -5
    32,   0,    0,    0,                          // 71 alignment
    10,   20,   30,   0,                          // 75 row 0
    40,   50,   60,   0,                          // 79 row 1
    1,                                            // 83 a plane
    100,  110,  120,  0,    130,  140,  150,  0,  // 84
    1,                                            // 92 the plane is full
};
constexpr std::size_t kPlaneFlagAt = 83;

bool Load(TZmBitmap& bitmap, const std::vector<std::uint8_t>& blob) {
    return bitmap.LoadRAWFromBufferOrStream(blob.data(), static_cast<std::int64_t>(blob.size()),
                                            nullptr);
}

std::vector<std::uint8_t> Save(TZmBitmap& bitmap) {
    std::vector<std::uint8_t> blob(static_cast<std::size_t>(bitmap.CalcRAWSize()), 0xEE);
    EXPECT_TRUE(bitmap.SaveRAWToBufferOrStream(blob.data(), static_cast<std::int64_t>(blob.size()),
                                               nullptr, false));
    return blob;
}

TEST(RawBlob, ReadsEveryField) {
    TZmBitmap bitmap;
    bitmap.SetModified(true);
    ASSERT_TRUE(Load(bitmap, kBlob));
    EXPECT_EQ(bitmap.GetWidth(), 3);
    EXPECT_EQ(bitmap.GetHeight(), 2);
    EXPECT_EQ(bitmap.GetPixelFormat(), zm8g);
    EXPECT_FALSE(bitmap.GetFull());
    EXPECT_EQ(bitmap.GetPaletteUsed(), 16);
    EXPECT_EQ(bitmap.GetBlackValue(), 10.0);
    EXPECT_EQ(bitmap.GetWhiteValue(), 20.0);
    EXPECT_EQ(bitmap.GetChannelOffset(1), -2);
    EXPECT_EQ(bitmap.GetChannelOffset(3), 4);
    EXPECT_TRUE(bitmap.GetEnableChannelOffset());
    EXPECT_EQ(bitmap.GetContrast(), -5);
    EXPECT_EQ(bitmap.GetPixels_zm8(2, 0), 30);
    EXPECT_EQ(bitmap.GetPixels_zm8(0, 1), 40);
    ASSERT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlpha(1, 1), 140);
    EXPECT_TRUE(bitmap.GetAlphaChannelRaw()->GetFull());
    EXPECT_FALSE(bitmap.GetModified());
    EXPECT_EQ(Save(bitmap), kBlob);
}

TEST(RawBlob, HasTheSizeOfItsParts) {
    TZmBitmap gray(2, 2, zm8g);
    EXPECT_EQ(gray.CalcRAWSize(), 84);  // 75 + 4 * 2 + 1
    gray.GetAlphaChannel();
    EXPECT_EQ(gray.CalcRAWSize(), 93);  // 1 + 4 * 2 more
    TZmBitmap indexed(5, 3, zm8p);
    EXPECT_EQ(indexed.CalcRAWSize(), 768 + 75 + 8 * 3 + 1);
    TZmBitmap empty;
    EXPECT_EQ(empty.CalcRAWSize(), 76);
    std::vector<std::uint8_t> buffer(100);
    EXPECT_FALSE(gray.SaveRAWToBufferOrStream(buffer.data(), 92, nullptr, false));
    EXPECT_FALSE(gray.SaveRAWToBufferOrStream(nullptr, 0, nullptr, false));
}

TEST(RawBlob, BringsBackEveryFormatAndAlignment) {
    for (int format = zm1g; format <= zm32RGB; ++format) {
        for (const std::int32_t alignment : {8, 32, 64, 1024}) {
            SCOPED_TRACE(format * 10000 + alignment);
            TZmBitmap source;
            source.SetBitAlignment(alignment);
            const auto noise = MakeNoise(static_cast<TZmPixelFormat>(format), 37, 5, 3);
            ASSERT_TRUE(source.Allocate(37, 5, noise->GetPixelFormat()));
            noise->CopyPaletteTo(&source);
            noise->CopyRectTo(&source, 0, 0, 0, 0, 37, 5, /*copy_alpha=*/false);
            AddNoiseAlpha(source, 5);
            TZmBitmap copy(4, 4, zm24RGB);
            ASSERT_TRUE(Load(copy, Save(source)));
            ExpectSamePixels(source, copy);
            ExpectSameAlpha(source, copy);
            EXPECT_EQ(copy.GetBitAlignment(), alignment);
            EXPECT_EQ(copy.GetRowLen(), source.GetRowLen());
            source.SetBitAlignment(16);  // waits for the next allocation
            ASSERT_TRUE(Load(copy, Save(source)));
            ExpectSamePixels(source, copy);
        }
    }
}

TEST(RawBlob, GoesThroughStreamsFromWhereTheyStand) {
    const auto source = MakeNoise(zm24RGB, 19, 7, 1);
    TMemoryStream stream;
    stream.WriteBuffer("before", 6);
    ASSERT_TRUE(source->SaveRAWToBufferOrStream(nullptr, 0, &stream, true));
    stream.WriteBuffer("behind", 6);
    EXPECT_EQ(stream.GetSize(), 12 + source->CalcRAWSize());
    stream.SetPosition(6);
    TZmBitmap copy;
    ASSERT_TRUE(copy.LoadRAWFromBufferOrStream(nullptr, 0, &stream));
    ExpectSamePixels(*source, copy);
    EXPECT_EQ(stream.GetPosition(), 6 + source->CalcRAWSize());
    EXPECT_FALSE(copy.LoadRAWFromBufferOrStream(nullptr, 0, &stream));  // no magic there
    EXPECT_EQ(stream.GetPosition(), 6 + source->CalcRAWSize());
}

TEST(RawBlob, BringsBackPalettesOfGreysAndShortOnes) {
    TZmBitmap gray(2, 2, zm8g);
    gray.Fill(9.0);
    gray.SetGrayPalette();
    TZmBitmap copy;
    ASSERT_TRUE(Load(copy, Save(gray)));
    EXPECT_EQ(copy.GetPaletteArray(), gray.GetPaletteArray());
    std::vector<std::uint8_t> blob = kBlob;
    blob[16] = 1;
    blob[28] = zm8p;
    blob.insert(blob.begin() + 20, {7, 8, 9});
    ASSERT_TRUE(Load(copy, blob));
    EXPECT_EQ(copy.GetPaletteLen(), 256);
    EXPECT_EQ(copy.GetPalette(0), (TRGB{7, 8, 9}));
    EXPECT_EQ(copy.GetPalette(1), TRGB{});
}

TEST(RawBlob, DropsThePlaneThatTheImageHad) {
    TZmBitmap bitmap(9, 9, zm24RGB);
    bitmap.AlphaFill(7);
    TZmBitmap plain(2, 2, zm8g);
    plain.Fill(9.0);
    ASSERT_TRUE(Load(bitmap, Save(plain)));
    EXPECT_FALSE(bitmap.HasAlphaChannel());
}

TEST(RawBlob, FillsUpAPlaneThatIsTooSmall) {
    TZmBitmap bitmap(6, 4, zm24RGB);
    bitmap.Fill(0.0);
    auto plane = TZmBitmap::CreateAsAlphaChannel(2, 2, zmMemory);
    plane->Fill(17.0);
    bitmap.ReplaceAlphaChannel(std::move(plane));
    TZmBitmap copy;
    ASSERT_TRUE(Load(copy, Save(bitmap)));
    EXPECT_EQ(copy.GetAlpha(1, 1), 17);
    EXPECT_EQ(copy.GetAlpha(2, 1), 255);
    EXPECT_EQ(copy.GetAlpha(5, 3), 255);
}

TEST(RawBlob, WritesNoBytesOfItsMemory) {
    TZmBitmap bits(3, 1, zm1g);
    std::memset(bits.GetScanLine(0), 0xFF, static_cast<std::size_t>(bits.GetRowLen()));
    const std::vector<std::uint8_t> blob = Save(bits);
    EXPECT_EQ(blob[75], 0xE0);  // three pixels, five unused bits
    EXPECT_EQ(blob[76] | blob[77] | blob[78], 0);
}

TEST(RawBlob, IsRefusedByPlatformBitmapsThatCannotHoldIt) {
    TZmBitmap bitmap;
    bitmap.SetLocation(zmTBitmap);
    const auto before = MakeNoise(zm8p, 5, 5, 8);
    bitmap.AssignImage(before.get());
    EXPECT_FALSE(Load(bitmap, Save(*MakeNoise(zm32f, 5, 5, 8))));
    ExpectSamePixels(*before, bitmap);
}

// Blobs that are none.

void ExpectRefused(const std::vector<std::uint8_t>& blob, const std::string& what) {
    const auto before = MakeNoise(zm24RGB, 8, 8, 4);
    TZmBitmap bitmap(*before);
    bitmap.SetModified(true);
    EXPECT_FALSE(Load(bitmap, blob)) << what;
    ExpectSamePixels(*before, bitmap);
    EXPECT_FALSE(bitmap.HasAlphaChannel()) << what;
    EXPECT_TRUE(bitmap.GetModified()) << what;
    TMemoryStream stream(blob);
    EXPECT_FALSE(bitmap.LoadRAWFromBufferOrStream(nullptr, 0, &stream)) << what;
    EXPECT_EQ(stream.GetPosition(), 0) << what;
}

TEST(RawBlob, RefusesEveryTruncation) {
    for (std::size_t size = 0; size < kBlob.size(); ++size) {
        ExpectRefused({kBlob.begin(), kBlob.begin() + static_cast<std::ptrdiff_t>(size)},
                      std::to_string(size) + " bytes");
    }
    std::vector<std::uint8_t> longer = kBlob;  // a block of the clipboard may be rounded up
    longer.resize(200, 0xCC);
    longer[12] = 9;  // a later version
    TZmBitmap bitmap;
    EXPECT_TRUE(Load(bitmap, longer));
}

TEST(RawBlob, RefusesFieldsThatNoBitmapHas) {
    struct TCase {
        const char* what;
        std::size_t offset;
        std::vector<std::uint8_t> bytes;
    };
    const TCase cases[] = {
        {"magic", 0, {'t'}},
        {"magic's end", 11, {'w'}},
        {"version -1", 12, {0xFF, 0xFF, 0xFF, 0xFF}},
        {"palette -1", 16, {0xFF, 0xFF, 0xFF, 0xFF}},
        {"palette beyond the data", 16, {200, 0, 0, 0}},
        {"palette 2^31 - 1", 16, {0xFF, 0xFF, 0xFF, 0x7F}},
        {"width 0", 20, {0, 0, 0, 0}},
        {"width -3", 20, {0xFD, 0xFF, 0xFF, 0xFF}},
        {"width 2^31 - 1", 20, {0xFF, 0xFF, 0xFF, 0x7F}},
        {"width 9 beyond the data", 20, {9, 0, 0, 0}},
        {"height 0", 24, {0, 0, 0, 0}},
        {"height 2^31 - 1", 24, {0xFF, 0xFF, 0xFF, 0x7F}},
        {"height 5 beyond the data", 24, {5, 0, 0, 0}},
        {"format zmnull", 28, {0}},
        {"format 11", 28, {11}},
        {"format 255", 28, {255}},
        {"format of 48 bits", 28, {8}},
        {"flag 2", 29, {2}},
        {"palette used -1", 30, {0xFF, 0xFF, 0xFF, 0xFF}},
        {"palette used 257", 30, {1, 1, 0, 0}},
        {"black is no number", 34, {0, 0, 0, 0, 0, 0, 0xF8, 0x7F}},
        {"white is infinite", 42, {0, 0, 0, 0, 0, 0, 0xF0, 0xFF}},
        {"offsets' flag 255", 66, {255}},
        {"alignment 0", 71, {0, 0, 0, 0}},
        {"alignment 4", 71, {4, 0, 0, 0}},
        {"alignment 24", 71, {24, 0, 0, 0}},
        {"alignment 128 beyond the data", 71, {128, 0, 0, 0}},
        {"alignment 2048", 71, {0, 8, 0, 0}},
        {"alignment with the sign bit", 71, {0, 0, 0, 0x80}},
        {"plane's flag 2", kPlaneFlagAt, {2}},
        {"plane's fFull 7", 92, {7}},
    };
    for (const TCase& test : cases) {
        std::vector<std::uint8_t> blob = kBlob;
        std::memcpy(blob.data() + test.offset, test.bytes.data(), test.bytes.size());
        ExpectRefused(blob, test.what);
    }
}

TEST(RawBlob, LeavesVirtualBitmapsAlone) {
    TZmBitmap bitmap(3, 3, zm24RGB);
    bitmap.SetOnRenderVirtualPixel([](TZmBitmap*, std::int32_t x, std::int32_t, void* pixel) {
        std::memset(pixel, x * 10, 3);
    });
    EXPECT_FALSE(Load(bitmap, kBlob));
    const std::vector<std::uint8_t> blob = Save(bitmap);  // its rows are rendered
    EXPECT_EQ(blob[75 + 3], 10);
}

}  // namespace
}  // namespace zm::test
