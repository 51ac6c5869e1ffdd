// The bitmap writer: files compared byte for byte with ones worked out by hand, and round trips
// through the reader.

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/bmpfilt.h"
#include "engine/codecs/bmpfilt_p.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

bool WriteTo(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool with_alpha = false) {
    test::TTestProgress progress;
    WriteBMPStream(stream, bitmap, params, with_alpha, progress.record);
    return !progress.aborting;
}

TBytes Write(TZmBitmap& bitmap, TIOParams& params, bool with_alpha = false) {
    TMemoryStream stream;
    EXPECT_TRUE(WriteTo(stream, bitmap, params, with_alpha));
    EXPECT_EQ(stream.GetPosition(), stream.GetSize());
    return stream.Bytes();
}

struct TReadBack {
    TZmBitmap bitmap;
    TZmMask alpha;
    TIOParams params;
};

void ReadBack(const TBytes& bytes, TReadBack& result, bool native) {
    TMemoryStream stream(bytes);
    test::TTestProgress progress;
    result.params.fNativePixelFormat = native;
    ReadBMPStream(stream, result.bitmap, 0, false, result.alpha, false, false, progress.record,
                  result.params);
    ASSERT_FALSE(progress.aborting);
}

// 2 x 2: blue, green over red, grey 0x808080.
void MakeFourColors(TZmBitmap& bitmap) {
    ASSERT_TRUE(bitmap.Allocate(2, 2, zm24RGB));
    bitmap.SetPixels_zm24RGB(0, 0, TRGB{255, 0, 0});
    bitmap.SetPixels_zm24RGB(1, 0, TRGB{0, 255, 0});
    bitmap.SetPixels_zm24RGB(0, 1, TRGB{0, 0, 255});
    bitmap.SetPixels_zm24RGB(1, 1, TRGB{128, 128, 128});
}

TBytes EncodeRow(const TBytes& indices, int bits) {
    TBytes output;
    (bits == 8 ? EncodeBmpRle8Row : EncodeBmpRle4Row)(indices, output);
    return output;
}

TBytes Tail(const TBytes& file, std::size_t count) {
    return {file.end() - static_cast<std::ptrdiff_t>(count), file.end()};
}

TBytes Part(const TBytes& file, std::ptrdiff_t from, std::ptrdiff_t to) {
    return {file.begin() + from, file.begin() + to};
}

TEST(BmpWriter, Writes24Bits) {
    TZmBitmap bitmap;
    MakeFourColors(bitmap);
    TIOParams params;
    params.SetDpiX(72);
    params.SetDpiY(300);
    const TBytes expected = {
        'B',  'M',  70,  0,   0,   0,   0, 0, 0,   0, 54, 0, 0,   0,  // file size 70, pixels at 54
        40,   0,    0,   0,   2,   0,   0, 0, 2,   0, 0,  0, 1,   0, 24, 0,
        0,    0,    0,   0,  // compression
        16,   0,    0,   0,  // data size
        0x13, 0x0B, 0,   0,  // 72 / 2.54 * 100 = 2834.6
        0x23, 0x2E, 0,   0,  // 300 / 2.54 * 100 = 11811.02
        0,    0,    0,   0,  // colours used
        0,    0,    0,   1,  // colours important: 1 << 24
        0,    0,    255, 128, 128, 128, 0, 0, 255, 0, 0,  0, 255, 0, 0,  0,
    };
    EXPECT_EQ(Write(bitmap, params), expected);
}

TEST(BmpWriter, Writes32BitsOnlyWithHandledAlpha) {
    TZmBitmap bitmap;
    MakeFourColors(bitmap);
    bitmap.SetAlpha(0, 0, 7);
    TIOParams params;
    const TBytes with = Write(bitmap, params, /*with_alpha=*/true);
    ASSERT_EQ(with.size(), 54u + 16u);
    EXPECT_EQ(with[28], 32);
    EXPECT_EQ(Part(with, 46, 54), TBytes(8, 0));
    const TBytes pixels = {0, 0, 255, 255, 128, 128, 128, 255, 255, 0, 0, 7, 0, 255, 0, 255};
    EXPECT_EQ(Tail(with, 16), pixels);
    const TBytes without = Write(bitmap, params, /*with_alpha=*/false);
    EXPECT_EQ(without[28], 24);
    EXPECT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlpha(0, 0), 7);
}

TEST(BmpWriter, WritesOneBit) {
    TZmBitmap bits;
    ASSERT_TRUE(bits.Allocate(10, 2, zm1g));
    for (std::int32_t x = 0; x < 10; ++x) {
        bits.SetPixels_zm1g(x, 0, x % 2 == 0);  // 1010101010
        bits.SetPixels_zm1g(x, 1, true);
    }
    bits.GetScanLine(1)[1] |= 0x3F;  // bits behind the last pixel do not go to the file
    TIOParams params;
    params.UpdateBPSAndSPP(zm1g);
    const TBytes file = Write(bits, params);
    const TBytes tail = {
        2,    0,    0, 0, 2,    0,    0,   0,  // two colours, both important
        0,    0,    0, 0, 255,  255,  255, 0,  // black, white
        0xFF, 0xC0, 0, 0, 0xAA, 0x80, 0,   0,
    };
    ASSERT_EQ(file.size(), 70u);
    EXPECT_EQ(Tail(file, 24), tail);
    // The 12-byte header has three bytes an entry.
    params.fBMP_Version = ioBMP_BMOS2V1;
    const TBytes expected = {
        'B', 'M', 40, 0, 0, 0, 0, 0, 0, 0,   32,  0,   0,    0,    12, 0, 0,    0,    10, 0,
        2,   0,   1,  0, 1, 0, 0, 0, 0, 255, 255, 255, 0xFF, 0xC0, 0,  0, 0xAA, 0x80, 0,  0,
    };
    EXPECT_EQ(Write(bits, params), expected);
}

TEST(BmpWriter, OneBitKeepsTwoColoursAndThresholdsMore) {
    TZmBitmap two;
    ASSERT_TRUE(two.Allocate(3, 1, zm24RGB));
    two.SetPixels_zm24RGB(0, 0, TRGB{0, 255, 255});  // yellow, the light one
    two.SetPixels_zm24RGB(1, 0, TRGB{200, 0, 0});
    two.SetPixels_zm24RGB(2, 0, TRGB{0, 255, 255});
    TIOParams params;
    params.fBitsPerSample = 1;
    const TBytes file = Write(two, params);
    const TBytes tail = {200, 0, 0, 0, 0, 255, 255, 0, 0xA0, 0, 0, 0};
    EXPECT_EQ(Tail(file, 12), tail);
    TZmBitmap ramp;
    ASSERT_TRUE(ramp.Allocate(4, 1, zm8g));
    for (std::int32_t x = 0; x < 4; ++x) {
        ramp.SetPixels_zm8(x, 0, static_cast<std::uint8_t>(x * 80));
    }
    const TBytes gray = Write(ramp, params);
    const TBytes black_white = {0, 0, 0, 0, 255, 255, 255, 0, 0x30, 0, 0, 0};
    EXPECT_EQ(Tail(gray, 12), black_white);
    EXPECT_EQ(ramp.GetPixelFormat(), zm8g);
}

TEST(BmpWriter, WritesFourBitsWithTheLongOs2Header) {
    TZmBitmap bitmap;
    MakeFourColors(bitmap);
    TIOParams params;
    params.fBitsPerSample = 4;
    params.fBMP_Version = ioBMP_BMOS2V2;
    const TBytes file = Write(bitmap, params);
    ASSERT_EQ(file.size(), 14u + 64u + 64u + 8u);
    EXPECT_EQ(Part(file, 2, 6), (TBytes{150, 0, 0, 0}));
    EXPECT_EQ(Part(file, 10, 18), (TBytes{142, 0, 0, 0, 64, 0, 0, 0}));
    EXPECT_EQ(Part(file, 34, 38), (TBytes{0, 0, 0, 0}));  // data size
    EXPECT_EQ(Part(file, 54, 78), TBytes(24, 0));         // the OS/2 tail
    // Few colours stand in the palette as they turn up from the top.
    const TBytes palette = {255, 0, 0, 0, 0, 255, 0, 0, 0, 0, 255, 0, 128, 128, 128, 0};
    EXPECT_EQ(Part(file, 78, 94), palette);
    EXPECT_EQ(Tail(file, 8), (TBytes{0x23, 0, 0, 0, 0x01, 0, 0, 0}));
    EXPECT_EQ(params.fColorMapCount, 16);
    EXPECT_EQ(params.fColorMap[2], (TRGB{0, 0, 255}));
}

TEST(BmpWriter, TakesGreysAsTheyStand) {
    TIOParams params;
    params.UpdateBPSAndSPP(zm8p);
    TZmBitmap gray;
    ASSERT_TRUE(gray.Allocate(3, 1, zm8g));
    gray.SetPixels_zm8(0, 0, 0);
    gray.SetPixels_zm8(1, 0, 77);
    gray.SetPixels_zm8(2, 0, 255);
    const TBytes file = Write(gray, params);
    EXPECT_EQ(Tail(file, 4), (TBytes{0, 77, 255, 0}));
    EXPECT_EQ(Part(file, 54 + 77 * 4, 54 + 78 * 4), (TBytes{77, 77, 77, 0}));
}

TEST(BmpWriter, FourBitsFromMoreThanSixteenColours) {
    // 8-bit values do not fit a nibble: grey goes to sixteen levels, indices are found anew.
    TZmBitmap gray;
    ASSERT_TRUE(gray.Allocate(2, 1, zm8g));
    gray.SetPixels_zm8(0, 0, 0x5F);
    gray.SetPixels_zm8(1, 0, 0xFF);
    TIOParams params;
    params.fBitsPerSample = 4;
    const TBytes file = Write(gray, params);
    EXPECT_EQ(file[file.size() - 4], 0x5F);
    EXPECT_EQ(params.fColorMap[5], (TRGB{80, 80, 80}));
    TZmBitmap indices;
    ASSERT_TRUE(indices.Allocate(2, 1, zm8p));
    indices.SetPalette(200, TRGB{1, 2, 3});
    indices.SetPalette(9, TRGB{40, 50, 60});
    indices.SetPixels_zm8(0, 0, 200);
    indices.SetPixels_zm8(1, 0, 9);
    TReadBack result;
    ReadBack(Write(indices, params), result, /*native=*/false);
    EXPECT_EQ(result.bitmap.GetPixels_zm24RGB(0, 0), (TRGB{1, 2, 3}));
    EXPECT_EQ(result.bitmap.GetPixels_zm24RGB(1, 0), (TRGB{40, 50, 60}));
    EXPECT_EQ(indices.GetPixels_zm8(0, 0), 200);
}

TEST(BmpWriter, EncodesRunLengthRows) {
    const struct {
        int bits;
        TBytes indices;
        TBytes expected;
    } cases[] = {
        {8, {5}, {1, 5, 0, 0}},
        {8, {5, 6}, {1, 5, 1, 6, 0, 0}},
        {8, {5, 6, 7}, {0, 3, 5, 6, 7, 0, 0, 0}},
        {8, {5, 6, 7, 8}, {0, 4, 5, 6, 7, 8, 0, 0}},
        {8, {5, 6, 6, 6, 7}, {1, 5, 3, 6, 1, 7, 0, 0}},
        {8, {1, 1, 2, 2}, {2, 1, 2, 2, 0, 0}},
        {8, TBytes(255, 9), {255, 9, 0, 0}},
        {8, TBytes(256, 9), {255, 9, 1, 9, 0, 0}},
        {4, {5}, {1, 0x50, 0, 0}},
        {4, {5, 6}, {2, 0x56, 0, 0}},
        {4, {5, 6, 7}, {0, 3, 0x56, 0x70, 0, 0}},
        {4, {5, 6, 7, 8, 9}, {0, 5, 0x56, 0x78, 0x90, 0, 0, 0}},
        {4, {5, 6, 7, 8, 9, 10}, {0, 6, 0x56, 0x78, 0x9A, 0, 0, 0}},
        {4, {15, 15, 15, 1}, {3, 0xFF, 1, 0x10, 0, 0}},
        {4, TBytes(256, 3), {255, 0x33, 1, 0x30, 0, 0}},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(EncodeRow(c.indices, c.bits), c.expected);
    }
}

// Literals are flushed once 256 have gathered: a piece of 255 with its pad, and one alone.
TEST(BmpWriter, EncodesLongStretchesOfLiterals) {
    TBytes indices;
    for (std::int32_t i = 0; i < 300; ++i) {
        indices.push_back(static_cast<std::uint8_t>(i % 7));
    }
    const TBytes encoded = EncodeRow(indices, 8);
    TBytes expected = {0, 255};
    expected.insert(expected.end(), indices.begin(), indices.begin() + 255);
    const TBytes middle = {0, 1, indices[255], 0, 44};
    expected.insert(expected.end(), middle.begin(), middle.end());
    expected.insert(expected.end(), indices.begin() + 256, indices.end());
    expected.insert(expected.end(), {0, 0});
    EXPECT_EQ(encoded, expected);
    const TBytes nibbles = EncodeRow(indices, 4);
    // 2 + 128 bytes, then 1 pixel, then 2 + 22 bytes, then the end of the line.
    ASSERT_EQ(nibbles.size(), 130u + 2u + 24u + 2u);
    EXPECT_EQ(nibbles[1], 255);
    EXPECT_EQ(nibbles[130], 1);
    EXPECT_EQ(nibbles[131], indices[255] << 4);
    EXPECT_EQ(nibbles[133], 44);
}

TEST(BmpWriter, WritesRunLengthFilesWithTheirEndMark) {
    TZmBitmap bitmap;
    ASSERT_TRUE(bitmap.Allocate(3, 2, zm8p));
    bitmap.SetPalette(1, TRGB{10, 20, 30});
    for (std::int32_t i = 0; i < 6; ++i) {
        bitmap.SetPixels_zm8(i % 3, i / 3, i < 3 ? 1 : static_cast<std::uint8_t>(i));
    }
    TIOParams params;
    params.UpdateBPSAndSPP(zm8p);
    params.fBMP_Compression = ioBMP_RLE;
    const TBytes file = Write(bitmap, params);
    const TBytes data = {0, 3, 3, 4, 5, 0, 0, 0, 3, 1, 0, 0, 1, 0};
    ASSERT_EQ(file.size(), 54u + 1024u + data.size());
    EXPECT_EQ(file[30], 1);
    EXPECT_EQ(file[34], data.size());
    EXPECT_EQ(Tail(file, data.size()), data);
    params.fBitsPerSample = 4;
    EXPECT_EQ(Write(bitmap, params)[30], 2);
    // Without a field for the compression, and without an encoder, rows go out plain.
    params.fBMP_Version = ioBMP_BMOS2V1;
    EXPECT_EQ(Write(bitmap, params).size(), 14u + 12u + 48u + 8u);
    params.fBMP_Version = ioBMP_BM3;
    params.fBitsPerSample = 8;
    params.fSamplesPerPixel = 3;
    EXPECT_EQ(Write(bitmap, params).size(), 54u + 24u);
}

TEST(BmpWriter, ShortWritesFail) {
    TZmBitmap bitmap;
    MakeFourColors(bitmap);
    TIOParams params;
    constexpr std::int64_t kAllBytes = 70 + 54;  // the headers are written twice
    for (std::int64_t room = 0; room <= kAllBytes; ++room) {
        for (const bool raises : {false, true}) {
            test::TFullStream stream(room, raises);
            EXPECT_EQ(WriteTo(stream, bitmap, params), room == kAllBytes) << room;
        }
    }
}

TEST(BmpWriter, RefusesWhatTheFileCannotHold) {
    TIOParams params;
    TMemoryStream stream;
    TZmBitmap empty;
    EXPECT_FALSE(WriteTo(stream, empty, params));
    TZmBitmap wide;
    ASSERT_TRUE(wide.Allocate(65536, 1, zm1g));
    params.fBMP_Version = ioBMP_BMOS2V1;
    EXPECT_FALSE(WriteTo(stream, wide, params));
}

TEST(BmpWriter, WritesBehindWhatTheStreamHoldsAndStopsWhenTold) {
    TZmBitmap bitmap;
    MakeFourColors(bitmap);
    TIOParams params;
    const TBytes alone = Write(bitmap, params);
    TMemoryStream stream;
    stream.WriteBuffer("xyz", 3);
    ASSERT_TRUE(WriteTo(stream, bitmap, params));
    EXPECT_EQ(Tail(stream.Bytes(), alone.size()), alone);
    TMemoryStream stopped;
    test::TTestProgress progress(1);
    WriteBMPStream(stopped, bitmap, params, false, progress.record);
    EXPECT_TRUE(progress.aborting);
    EXPECT_EQ(stopped.GetSize(), 54 + 8);
    EXPECT_EQ(stopped.Bytes()[10], 0);  // the header was not completed
}

TEST(BmpRoundTrip, KeepsPixels) {
    const struct {
        TZmPixelFormat format;
        TIOBMPVersion version;
        TIOBMPCompression compression;
    } cases[] = {
        {zm1g, ioBMP_BM3, ioBMP_UNCOMPRESSED},  {zm1g, ioBMP_BMOS2V1, ioBMP_RLE},
        {zm8p, ioBMP_BM3, ioBMP_UNCOMPRESSED},  {zm8p, ioBMP_BM3, ioBMP_RLE},
        {zm8p, ioBMP_BMOS2V1, ioBMP_RLE},       {zm8p, ioBMP_BMOS2V2, ioBMP_RLE},
        {zm24RGB, ioBMP_BM3, ioBMP_RLE},        {zm24RGB, ioBMP_BMOS2V1, ioBMP_UNCOMPRESSED},
        {zm24RGB, ioBMP_V5, ioBMP_UNCOMPRESSED}};
    constexpr std::int32_t kSizes[][2] = {{1, 1},  {1, 2},  {7, 1},  {3, 3},  {16, 15},
                                          {31, 5}, {32, 4}, {33, 7}, {301, 2}};
    for (const auto& c : cases) {
        for (const auto& size : kSizes) {
            SCOPED_TRACE(testing::Message() << "format " << c.format << " version " << c.version
                                            << ", " << size[0] << " x " << size[1]);
            auto source = test::MakeNoise(c.format, size[0], size[1], 17);
            TIOParams params;
            params.UpdateBPSAndSPP(c.format);
            params.fBMP_Version = c.version;
            params.fBMP_Compression = c.compression;
            TReadBack result;
            ReadBack(Write(*source, params), result, c.format == zm8p);
            test::ExpectSamePixels(*source, result.bitmap);
        }
    }
}

TEST(BmpRoundTrip, KeepsAlphaAndNibbles) {
    auto source = test::MakeNoise(zm24RGB, 33, 9, 5);
    test::AddNoiseAlpha(*source, 6);
    TIOParams params;
    TReadBack result;
    ReadBack(Write(*source, params, /*with_alpha=*/true), result, false);
    test::ExpectSamePixels(*source, result.bitmap);
    result.bitmap.CopyFromTZmMask(result.alpha);
    test::ExpectSameAlpha(*source, result.bitmap);
    auto nibbles = test::MakeNoise(zm8p, 35, 9, 7);
    for (std::int32_t y = 0; y < 9; ++y) {
        std::uint8_t* row = nibbles->GetScanLine(y);
        std::transform(row, row + 35, row, [](std::uint8_t i) { return std::uint8_t(i & 3); });
    }
    params.fBitsPerSample = 4;
    for (const TIOBMPCompression compression : {ioBMP_UNCOMPRESSED, ioBMP_RLE}) {
        params.fBMP_Compression = compression;
        TReadBack back;
        ReadBack(Write(*nibbles, params), back, /*native=*/true);
        test::ExpectSamePixels(*nibbles, back.bitmap);
    }
}

}  // namespace
}  // namespace zm
