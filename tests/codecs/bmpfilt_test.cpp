// The bitmap reader against files written by hand, byte by byte.

#include "engine/codecs/bmpfilt.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <vector>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

TBytes Join(std::initializer_list<TBytes> parts) {
    TBytes all;
    for (const TBytes& part : parts) {
        all.insert(all.end(), part.begin(), part.end());
    }
    return all;
}

TBytes Dword(std::uint32_t value) {
    return {static_cast<std::uint8_t>(value), static_cast<std::uint8_t>(value >> 8),
            static_cast<std::uint8_t>(value >> 16), static_cast<std::uint8_t>(value >> 24)};
}

struct TReadOptions {
    bool native = false;
    bool ignore_alpha = false;
    bool no_file_header = false;
    bool params_only = false;
    std::int64_t byte_limit = 0;
};

struct TReadResult {
    TZmBitmap bitmap;
    TZmMask alpha;
    TIOParams params;
    bool failed = false;

    TRGB At(std::int32_t x, std::int32_t y) { return bitmap.GetPixels_zm24RGB(x, y); }
};

void ReadFrom(TStream& stream, TReadResult& result, const TReadOptions& options = {}) {
    TProgressRec progress;
    result.failed = false;
    progress.Aborting = &result.failed;
    result.params.fNativePixelFormat = options.native;
    ReadBMPStream(stream, result.bitmap, options.byte_limit, options.ignore_alpha, result.alpha,
                  options.no_file_header, options.params_only, progress, result.params);
}

void Read(const TBytes& bytes, TReadResult& result, const TReadOptions& options = {}) {
    TMemoryStream stream(bytes);
    ReadFrom(stream, result, options);
}

const TRGB kBlack{0, 0, 0};

// 2 x 2 pixels of 24 bits, bottom row first.
const TBytes kFile24 = {
    'B',  'M',                         // type
    70,   0,    0,  0,                 // file size
    0,    0,    0,  0,                 // reserved
    54,   0,    0,  0,                 // offset of the pixels
    40,   0,    0,  0,                 // header size
    2,    0,    0,  0,  2,  0,  0, 0,  // width, height
    1,    0,    24, 0,                 // planes, bit count
    0,    0,    0,  0,                 // compression
    16,   0,    0,  0,                 // image size
    0x13, 0x0B, 0,  0,                 // 2835 pixels per metre: 72 dpi
    0,    0,    0,  0,                 // none told: the default
    0,    0,    0,  0,  0,  0,  0, 0,  // colours used, important
    1,    2,    3,  4,  5,  6,  0, 0,  // bottom row: two pixels blue, green, red; padding
    7,    8,    9,  10, 11, 12, 0, 0,
};

// 3 x 2 pixels of 8 bits with RLE8, complete with its end mark.
const TBytes kFileRle8 = {
    'B', 'M', 78, 0, 0,  0,  0,  0, 0, 0, 62, 0, 0, 0,        // file header
    40,  0,   0,  0, 3,  0,  0,  0, 2, 0, 0,  0, 1, 0, 8, 0,  // size, 3 x 2, planes, 8 bits
    1,   0,   0,  0, 16, 0,  0,  0, 0, 0, 0,  0, 0, 0, 0, 0,  // RLE8
    2,   0,   0,  0, 0,  0,  0,  0,                           // two colours used
    10,  20,  30, 0, 40, 50, 60, 0,                           // palette
    3,   1,   0,  0,                                          // bottom row: 1 1 1, end of line
    0,   3,   1,  0, 1,  0,  0,  0,                           // literals 1 0 1, pad; end of line
    0,   1,   0,  0,                                          // end of bitmap, two bytes of slack
};

// A header of any size behind a file header, with the fields of the 40-byte form.
struct THeader {
    std::uint32_t size = 40;
    std::uint32_t width = 1;
    std::uint32_t height = 1;
    std::uint8_t bits = 24;
    std::uint32_t compression = 0;
    std::uint32_t colors_used = 0;
    std::uint32_t offset = 0;
};

TBytes MakeHeader(const THeader& header) {
    TBytes info = Join({Dword(header.size),
                        Dword(header.width),
                        Dword(header.height),
                        {1, 0, header.bits, 0},
                        Dword(header.compression),
                        Dword(0),
                        Dword(0),
                        Dword(0),
                        Dword(header.colors_used),
                        Dword(0)});
    info.resize(header.size, 0);
    return Join({{'B', 'M'}, Dword(0), Dword(0), Dword(header.offset), info});
}

TBytes MakeMasks(std::uint32_t red, std::uint32_t green, std::uint32_t blue) {
    return Join({Dword(red), Dword(green), Dword(blue)});
}

TEST(BmpReader, ReadsRowsBottomUpAndFillsTheParameters) {
    TReadResult result;
    Read(kFile24, result);
    ASSERT_FALSE(result.failed);
    ASSERT_EQ(result.bitmap.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(result.At(0, 0), (TRGB{7, 8, 9}));
    EXPECT_EQ(result.At(1, 0), (TRGB{10, 11, 12}));
    EXPECT_EQ(result.At(0, 1), (TRGB{1, 2, 3}));
    EXPECT_EQ(result.At(1, 1), (TRGB{4, 5, 6}));
    const TIOParams& params = result.params;
    EXPECT_EQ(params.fBMP_Version, ioBMP_BM3);
    EXPECT_EQ(params.fBMP_Compression, ioBMP_UNCOMPRESSED);
    EXPECT_EQ(params.fWidth, 2);
    EXPECT_EQ(params.fOriginalHeight, 2);
    EXPECT_EQ(params.fBitsPerSample, 8);
    EXPECT_EQ(params.fSamplesPerPixel, 3);
    EXPECT_EQ(params.GetDpiX(), 72);
    EXPECT_EQ(params.GetDpiY(), ZmGlobalSettings().fDefaultDPIY);
    EXPECT_EQ(params.GetImageCount(), 1);
    EXPECT_EQ(result.alpha.GetWidth(), 0);
}

TEST(BmpReader, NegativeHeightMeansTopRowFirst) {
    TBytes bytes = kFile24;
    const TBytes minus_two = Dword(0xFFFFFFFE);
    std::copy(minus_two.begin(), minus_two.end(), bytes.begin() + 22);
    TReadResult result;
    Read(bytes, result);
    ASSERT_FALSE(result.failed);
    EXPECT_EQ(result.params.fHeight, 2);
    EXPECT_EQ(result.At(0, 0), (TRGB{1, 2, 3}));
    EXPECT_EQ(result.At(1, 1), (TRGB{10, 11, 12}));
}

TEST(BmpReader, ReadsTheTwelveByteHeader) {
    const TBytes bytes = {
        'B',  'M',  0, 0, 0, 0, 0, 0, 0, 0, 74, 0, 0, 0,  // file header: pixels at 14 + 12 + 48
        12,   0,    0, 0, 3, 0, 1, 0, 1, 0, 4,  0,        // 3 x 1, 1 plane, 4 bits
        1,    2,    3, 4, 5, 6, 7, 8, 9,                  // entries 0 to 2, three bytes each
        0,    0,    0, 0, 0, 0, 0, 0, 0, 0, 0,  0, 0, 0, 0, 0, 0, 0, 0, 0,
        0,    0,    0, 0, 0, 0, 0, 0, 0, 0, 0,  0, 0, 0, 0, 0, 0, 0, 0,  // entries 3 to 15
        0x21, 0x00, 0, 0,                                                // indices 2, 1, 0
    };
    TReadResult result;
    Read(bytes, result);
    ASSERT_FALSE(result.failed);
    EXPECT_EQ(result.params.fBMP_Version, ioBMP_BMOS2V1);
    EXPECT_EQ(result.params.fColorMapCount, 16);
    EXPECT_EQ(result.params.GetDpiX(), ZmGlobalSettings().fDefaultDPIX);
    EXPECT_EQ(result.At(0, 0), (TRGB{7, 8, 9}));
    EXPECT_EQ(result.At(1, 0), (TRGB{4, 5, 6}));
    EXPECT_EQ(result.At(2, 0), (TRGB{1, 2, 3}));
}

TEST(BmpReader, TellsHeadersBySize) {
    const struct {
        std::uint32_t size;
        TIOBMPVersion version;
    } cases[] = {{16, ioBMP_BM},  {40, ioBMP_BM3},     {52, ioBMP_BM},
                 {56, ioBMP_BM},  {64, ioBMP_BMOS2V2}, {90, ioBMP_BM},
                 {108, ioBMP_V4}, {124, ioBMP_V5},     {300, ioBMP_BM}};
    for (const auto& c : cases) {
        SCOPED_TRACE(c.size);
        TReadResult result;
        Read(Join({MakeHeader({.size = c.size}), {9, 8, 7, 0}}), result);
        ASSERT_FALSE(result.failed);
        EXPECT_EQ(result.params.fBMP_Version, c.version);
        EXPECT_EQ(result.At(0, 0), (TRGB{9, 8, 7}));
    }
}

TEST(BmpReader, OneBitFollowsTheOrderOfBlackAndWhite) {
    const TBytes header = MakeHeader({.width = 10, .height = 1, .bits = 1, .colors_used = 2});
    const TBytes row = {0xA5, 0x40, 0, 0};  // 10100101 01
    const TBytes black_white = {0, 0, 0, 0, 255, 255, 255, 0};
    const TBytes white_black = {255, 255, 255, 0, 0, 0, 0, 0};
    TReadResult plain;
    Read(Join({header, black_white, row}), plain);
    TReadResult inverted;
    Read(Join({header, white_black, row}), inverted);
    ASSERT_FALSE(plain.failed || inverted.failed);
    ASSERT_EQ(plain.bitmap.GetPixelFormat(), zm1g);
    EXPECT_EQ(plain.params.fBitsPerSample, 1);
    const bool expected[10] = {true, false, true, false, false, true, false, true, false, true};
    for (std::int32_t x = 0; x < 10; ++x) {
        EXPECT_EQ(plain.bitmap.GetPixels_zm1g(x, 0), expected[x]) << x;
        EXPECT_EQ(inverted.bitmap.GetPixels_zm1g(x, 0), !expected[x]) << x;
    }
    // A third entry, never used, tells that the two are no black and white picture's.
    TReadResult three;
    Read(Join({MakeHeader({.width = 10, .height = 1, .bits = 1, .colors_used = 3}), white_black,
               Dword(0), row}),
         three);
    EXPECT_TRUE(three.bitmap.GetPixels_zm1g(0, 0));
}

TEST(BmpReader, PaletteImagesBecomeColoursOrStayIndices) {
    // Two colours used; index 7 is beyond them and black.
    const TBytes bytes = Join({MakeHeader({.width = 3, .bits = 8, .colors_used = 2}),
                               {1, 2, 3, 0, 4, 5, 6, 0},
                               {1, 7, 0, 0}});
    TReadResult colors;
    Read(bytes, colors);
    ASSERT_EQ(colors.bitmap.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(colors.At(0, 0), (TRGB{4, 5, 6}));
    EXPECT_EQ(colors.At(1, 0), kBlack);
    EXPECT_EQ(colors.At(2, 0), (TRGB{1, 2, 3}));
    EXPECT_EQ(colors.params.fColorMap, (std::vector<TRGB>{{1, 2, 3}, {4, 5, 6}}));
    TReadResult native;
    Read(bytes, native, {.native = true});
    ASSERT_EQ(native.bitmap.GetPixelFormat(), zm8p);
    EXPECT_EQ(native.bitmap.GetPixels_zm8(1, 0), 7);
    EXPECT_EQ(native.bitmap.GetPalette(1), (TRGB{4, 5, 6}));
    EXPECT_EQ(native.bitmap.GetPalette(7), kBlack);
    TReadResult nibbles;
    Read(Join({MakeHeader({.width = 3, .bits = 4, .colors_used = 1}),
               {1, 2, 3, 0},
               {0xF1, 0x50, 0, 0}}),
         nibbles, {.native = true});
    const std::uint8_t* row = nibbles.bitmap.GetScanLine(0);
    EXPECT_EQ(TBytes(row, row + 3), (TBytes{15, 1, 5}));
    // Two bits have colours only, five pixels 3 0 2 1 3.
    TReadResult pairs;
    Read(Join({MakeHeader({.width = 5, .bits = 2}),
               {1, 2, 3, 0, 4, 5, 6, 0, 7, 8, 9, 0, 10, 11, 12, 0},
               {0xC9, 0xC0, 0, 0}}),
         pairs, {.native = true});
    ASSERT_EQ(pairs.bitmap.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(pairs.At(0, 0), (TRGB{10, 11, 12}));
    EXPECT_EQ(pairs.At(1, 0), (TRGB{1, 2, 3}));
    EXPECT_EQ(pairs.At(2, 0), (TRGB{7, 8, 9}));
    EXPECT_EQ(pairs.At(3, 0), (TRGB{4, 5, 6}));
    EXPECT_EQ(pairs.At(4, 0), (TRGB{10, 11, 12}));
    EXPECT_EQ(pairs.params.fBitsPerSample, 2);
}

TEST(BmpReader, SixteenBitMasksGiveTheShifts) {
    const struct {
        const char* name;
        TBytes masks;  // empty: compression 0
        std::uint16_t word;
        TRGB expected;  // blue, green, red
    } cases[] = {
        {"5-5-5 red", {}, 0x7C00, {0, 0, 0xF8}},
        {"5-5-5 all", {}, 0x7FFF, {0xF8, 0xF8, 0xF8}},
        {"5-5-5 top bit ignored", {}, 0x8000, {0, 0, 0}},
        {"5-5-5 low bits", {}, 0x0421, {8, 8, 8}},
        {"5-6-5 green", MakeMasks(0xF800, 0x07E0, 0x1F), 0x07E0, {0, 0xFC, 0}},
        {"5-6-5 red, blue", MakeMasks(0xF800, 0x07E0, 0x1F), 0xF81F, {0xF8, 0, 0xF8}},
        {"4-4-4", MakeMasks(0xF00, 0xF0, 0xF), 0x0ABC, {0xC0, 0xB0, 0xA0}},
        {"3-3-2", MakeMasks(0xE0, 0x1C, 3), 0x00FF, {0xC0, 0xE0, 0xE0}},
        {"all ones is grey", MakeMasks(0xFFFF, 0, 0), 0xAB12, {0xAB, 0xAB, 0xAB}},
        {"32 ones are grey", MakeMasks(0, 0xFFFFFFFF, 0), 0xAB12, {0xAB, 0xAB, 0xAB}},
        {"no masks", MakeMasks(0, 0, 0), 0xFFFF, {0, 0, 0}},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const std::uint32_t compression = c.masks.empty() ? 0 : 3;
        const TBytes pixel = {static_cast<std::uint8_t>(c.word),
                              static_cast<std::uint8_t>(c.word >> 8), 0, 0};
        const TBytes bytes =
            Join({MakeHeader({.bits = 16, .compression = compression}), c.masks, pixel});
        TReadResult result;
        Read(bytes, result);
        ASSERT_FALSE(result.failed);
        EXPECT_EQ(result.At(0, 0), c.expected);
        EXPECT_EQ(result.params.fBitsPerSample, 5);
        EXPECT_EQ(result.params.fSamplesPerPixel, 3);
        TReadResult native;
        Read(bytes, native, {.native = true});
        ASSERT_EQ(native.bitmap.GetPixelFormat(), zm16g);
        EXPECT_EQ(native.bitmap.GetPixels_zm16g(0, 0), c.word);
    }
}

TEST(BmpReader, MasksLieInLongHeadersAndBehindShortOnes) {
    const TBytes three = MakeMasks(0xF800, 0x07E0, 0x1F);
    for (const std::uint32_t compression : {3u, 6u}) {
        const TBytes masks = compression == 3 ? three : Join({three, Dword(0)});
        for (const std::uint32_t size : {40u, 52u, 56u, 64u, 108u, 124u}) {
            SCOPED_TRACE(testing::Message() << compression << ", header " << size);
            TBytes bytes = MakeHeader({.size = size, .bits = 16, .compression = compression});
            if (size == 40 || size == 64) {
                bytes.insert(bytes.end(), masks.begin(), masks.end());
            } else {
                std::copy(three.begin(), three.end(), bytes.begin() + 14 + 40);
            }
            TReadResult result;
            Read(Join({bytes, {0xE0, 0x07, 0, 0}}), result);
            ASSERT_FALSE(result.failed);
            EXPECT_EQ(result.At(0, 0), (TRGB{0, 0xFC, 0}));
        }
    }
}

TEST(BmpReader, AlphaOf32BitFiles) {
    const TBytes header = MakeHeader({.width = 2, .bits = 32});
    const TBytes some = {1, 2, 3, 0, 4, 5, 6, 128};
    const TBytes none = {1, 2, 3, 0, 4, 5, 6, 0};
    const TBytes full = {1, 2, 3, 255, 4, 5, 6, 255};
    TReadResult result;
    Read(Join({header, some}), result);
    ASSERT_FALSE(result.failed);
    EXPECT_EQ(result.At(1, 0), (TRGB{4, 5, 6}));
    ASSERT_EQ(result.alpha.GetWidth(), 2);
    EXPECT_EQ(result.alpha.GetPixel(0, 0), 0);
    EXPECT_EQ(result.alpha.GetPixel(1, 0), 128);
    EXPECT_EQ(result.alpha.GetX1(), 1);
    EXPECT_EQ(result.params.fSamplesPerPixel, 4);
    for (const TBytes& pixels : {none, full}) {
        Read(Join({header, pixels}), result);
        EXPECT_FALSE(result.failed);
        EXPECT_EQ(result.alpha.GetWidth(), 0);
    }
    Read(Join({header, some}), result, {.ignore_alpha = true});
    EXPECT_EQ(result.alpha.GetWidth(), 0);
}

TEST(BmpReader, MasksOf32BitFiles) {
    const TBytes pixel = {0x11, 0x22, 0x33, 0x44};
    // Red lowest, alpha highest, as four masks behind a short header.
    const TBytes four = Join({MakeHeader({.bits = 32, .compression = 3}),
                              MakeMasks(0xFF, 0xFF00, 0xFF0000), Dword(0xFF000000), pixel});
    TReadResult result;
    Read(four, result);
    ASSERT_FALSE(result.failed);
    EXPECT_EQ(result.At(0, 0), (TRGB{0x33, 0x22, 0x11}));
    EXPECT_EQ(result.alpha.GetPixel(0, 0), 0x44);
    // Pixels right behind the third mask: the first pixel is no alpha mask.
    const TBytes three = Join({MakeHeader({.bits = 32, .compression = 3, .offset = 66}),
                               MakeMasks(0xFF000000, 0xFF0000, 0xFF00), pixel});
    Read(three, result);
    ASSERT_FALSE(result.failed);
    EXPECT_EQ(result.At(0, 0), (TRGB{0x22, 0x33, 0x44}));
    EXPECT_EQ(result.alpha.GetWidth(), 0);
}

TBytes FromHex(const std::string& text) {
    TBytes bytes;
    for (std::size_t at = 0; at + 1 < text.size(); at += text[at] == ' ' ? 1 : 2) {
        if (text[at] != ' ') {
            bytes.push_back(static_cast<std::uint8_t>(std::stoi(text.substr(at, 2), nullptr, 16)));
        }
    }
    return bytes;
}

// An RLE file of 4 x 3 pixels whose palette entry i is (i, i, i), i to 15.
TBytes MakeRle(std::uint8_t bits, const TBytes& data, std::uint32_t height = 3) {
    TBytes palette;
    for (std::uint8_t i = 0; i < 16; ++i) {
        palette.insert(palette.end(), {i, i, i, 0});
    }
    return Join({MakeHeader({.width = 4,
                             .height = height,
                             .bits = bits,
                             .compression = bits == 8 ? 1u : 2u,
                             .colors_used = 16}),
                 palette, data});
}

// Rows from the top, one character a pixel in hexadecimal; the same in both output forms.
void ExpectRle(const TBytes& bytes, const std::string& expected, bool failed) {
    for (const bool native : {false, true}) {
        TReadResult result;
        Read(bytes, result, {.native = native});
        EXPECT_EQ(result.failed, failed);
        ASSERT_EQ(result.bitmap.GetHeight(), 3);
        std::string found;
        for (std::int32_t i = 0; i < 12; ++i) {
            const int value =
                native ? result.bitmap.GetPixels_zm8(i % 4, i / 4) : result.At(i % 4, i / 4).r;
            found += "0123456789ABCDEF"[value & 15];
            found += i % 4 == 3 && i < 11 ? "/" : "";
        }
        EXPECT_EQ(found, expected);
    }
}

TEST(BmpReader, DecodesRunLengthData) {
    const struct {
        const char* name;
        std::uint8_t bits;
        const char* data;  // hexadecimal
        const char* expected;
        bool failed = false;
    } cases[] = {
        {"runs, ends of line", 8, "0401 0000 0202 0203 0000 0404 0001", "4444/2233/1111"},
        {"literals, odd ones padded", 8, "0003 010203 09 0104 0000 0004 05060708 0001",
         "0000/5678/1234"},
        {"uncovered pixels take entry 0", 8, "0105 0000 0000 0106 0001", "6000/0000/5000"},
        {"past the row's end: the last pixel", 8, "0301 0302 0000 0005 0304050607 00 0001",
         "0000/3457/1112"},
        {"delta", 8, "0002 0201 0107 0000 0401 0001", "1111/0070/0000"},
        {"delta past the row's end", 8, "0002 C800 0107 0001", "0000/0000/0007"},
        {"delta past the last row", 8, "0103 0002 0109 0405 0406", "0000/0000/3000"},
        {"lines past the last row", 8, "0000 0000 0000 0401", "0000/0000/0000"},
        {"early end mark is complete", 8, "0401 0001", "0000/0000/1111"},
        {"data end in the first row", 8, "0401", "0000/0000/1111", true},
        {"data end in the last row", 8, "0000 0000 0201", "1100/0000/0000"},
        {"literals cut short", 8, "0004 0102", "0000/0000/1200", true},
        {"delta cut short", 8, "0002 01", "0000/0000/0000", true},
        {"a count without a value", 8, "04", "0000/0000/0000", true},
        {"nibbles alternate", 4, "0412 0000 0334 0000 015F 0001", "5000/3430/1212"},
        {"nibble literals", 4, "0003 1230 0000 0004 4567 0001", "0000/4567/1230"},
        {"five nibbles: three bytes and a pad", 4, "0005 123450 00 0000 0466 0001",
         "0000/6666/1235"},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        ExpectRle(MakeRle(c.bits, FromHex(c.data)), c.expected, c.failed);
    }
}

TEST(BmpReader, ByteLimitEndsTheCompressedData) {
    const TBytes data = {4, 1, 0, 0, 4, 2, 0, 0, 4, 3, 0, 1};
    TBytes bytes = MakeRle(8, data);
    TReadResult result;
    // Two rows of data belong to the image; the third row was reached but stays empty.
    Read(bytes, result, {.byte_limit = static_cast<std::int64_t>(bytes.size()) - 4});
    EXPECT_FALSE(result.failed);
    EXPECT_EQ(result.At(0, 0), kBlack);
    EXPECT_EQ(result.At(0, 1), (TRGB{2, 2, 2}));
    Read(bytes, result, {.byte_limit = static_cast<std::int64_t>(bytes.size()) - 8});
    EXPECT_TRUE(result.failed);
    // The size in the file header is such a limit.
    const TBytes size = Dword(static_cast<std::uint32_t>(bytes.size()) - 8);
    std::copy(size.begin(), size.end(), bytes.begin() + 2);
    Read(bytes, result);
    EXPECT_TRUE(result.failed);
    // But not one that ends before the pixels, which begin at 118.
    bytes[10] = 118;
    bytes[2] = 50;
    Read(bytes, result);
    EXPECT_FALSE(result.failed);
    EXPECT_EQ(result.At(0, 0), (TRGB{3, 3, 3}));
}

TEST(BmpReader, TruncationAtEveryByteFails) {
    for (std::size_t size = 0; size < kFile24.size(); ++size) {
        SCOPED_TRACE(size);
        TReadResult result;
        Read(test::FirstBytes(kFile24, size), result);
        EXPECT_EQ(result.failed, size < kFile24.size() - 2);  // the last row's padding may lack
    }
    constexpr std::size_t kLastRowReached = 66;  // behind the first row's end of line
    for (std::size_t size = 0; size < kFileRle8.size(); ++size) {
        SCOPED_TRACE(size);
        TReadResult result;
        Read(test::FirstBytes(kFileRle8, size), result);
        EXPECT_EQ(result.failed, size < kLastRowReached);
    }
}

TEST(BmpReader, UndeliveredRowsAreCleared) {
    TReadResult result;
    TBytes bytes = kFile24;
    Read(bytes, result);
    bytes.resize(62);     // the bottom row is there, the top row is not
    Read(bytes, result);  // into the same storage
    EXPECT_TRUE(result.failed);
    EXPECT_EQ(result.At(0, 1), (TRGB{1, 2, 3}));
    EXPECT_EQ(result.At(0, 0), kBlack);
    EXPECT_EQ(result.At(1, 0), kBlack);
}

TEST(BmpReader, HeaderFieldsAtTheirLimits) {
    constexpr std::uint32_t kSign = 0x80000000;
    constexpr std::uint32_t kMax = 0xFFFFFFFF;
    constexpr std::uint32_t kMost = 0x7FFFFFFF;
    const struct {
        std::size_t at;
        std::uint32_t value;
        bool failed;
    } cases[] = {
        // Offset (1 takes the headers as pixels), header size, width, height, planes and bits,
        // compression, resolution, colours used.
        {10, 1, false},         {10, kMax, true},       {10, kSign, true},
        {10, 70, true},         {14, 0, true},          {14, 1, true},
        {14, 71, true},         {14, kMax, true},       {18, 0, false},
        {18, kMost, true},      {18, kMax, true},       {18, kSign, true},
        {22, 0, false},         {22, 1, false},         {22, kMost, true},
        {22, kMax, false},      {22, kSign, true},      {26, 0x00000001, true},
        {26, 0x00030001, true}, {26, 0x01180001, true}, {26, 0xFFFF0001, true},
        {30, 1, true},          {30, 3, false},         {30, 4, true},
        {30, kMax, true},       {38, kMost, false},     {38, kSign, false},
        {46, kMax, false}};
    for (const auto& c : cases) {
        SCOPED_TRACE(testing::Message() << c.value << " at " << c.at);
        TBytes bytes = kFile24;
        const TBytes value = Dword(c.value);
        std::copy(value.begin(), value.end(), bytes.begin() + static_cast<std::ptrdiff_t>(c.at));
        TReadResult result;
        Read(bytes, result);
        EXPECT_EQ(result.failed, c.failed);
        Read(bytes, result, {.params_only = true});
    }
}

TEST(BmpReader, CompressionMustFitTheDepth) {
    const struct {
        std::uint8_t bits;
        std::uint32_t compression;
    } cases[] = {{1, 1}, {1, 2},  {1, 3},  {2, 1},  {4, 1},  {4, 3},  {8, 2},
                 {8, 3}, {16, 1}, {16, 2}, {24, 6}, {32, 1}, {32, 2}, {32, 5}};
    for (const auto& c : cases) {
        TReadResult result;
        Read(Join({MakeHeader({.bits = c.bits, .compression = c.compression}), TBytes(2000, 0)}),
             result);
        EXPECT_TRUE(result.failed) << int{c.bits} << " bits, compression " << c.compression;
        EXPECT_TRUE(result.bitmap.IsEmpty());
    }
}

TEST(BmpReader, SizesAreRefusedBeforeAllocation) {
    for (const std::uint8_t bits : {std::uint8_t{8}, std::uint8_t{24}, std::uint8_t{32}}) {
        for (const std::uint32_t compression : {0u, 1u}) {
            TReadResult result;
            Read(Join({MakeHeader({.width = 60000,
                                   .height = 60000,
                                   .bits = bits,
                                   .compression = bits == 8 ? compression : 0}),
                       TBytes(1100, 0)}),
                 result);
            EXPECT_TRUE(result.failed);
            EXPECT_TRUE(result.bitmap.IsEmpty());
        }
    }
}

TEST(BmpReader, ParamsOnlyAndEmptySizesLeaveTheBitmapAlone) {
    TReadResult empty;
    Read(kFile24, empty);
    Read(Join({MakeHeader({.width = 0}), {0, 0, 0, 0}}), empty);
    EXPECT_FALSE(empty.failed);
    EXPECT_EQ(empty.bitmap.GetWidth(), 2);
    EXPECT_EQ(empty.params.fWidth, 0);
    TReadResult result;
    TBytes bytes = kFileRle8;
    bytes.resize(62);  // no pixels are needed
    Read(bytes, result, {.params_only = true});
    EXPECT_FALSE(result.failed);
    EXPECT_TRUE(result.bitmap.IsEmpty());
    EXPECT_EQ(result.params.fWidth, 3);
    EXPECT_EQ(result.params.fBitsPerSample, 8);
    EXPECT_EQ(result.params.fSamplesPerPixel, 1);
    EXPECT_EQ(result.params.fBMP_Compression, ioBMP_RLE);
    EXPECT_EQ(result.params.fColorMapCount, 2);
}

TEST(BmpReader, StartsAtTheInfoHeaderWhenToldSo) {
    const TBytes bytes(kFile24.begin() + 14, kFile24.end());
    TReadResult result;
    Read(bytes, result, {.no_file_header = true});
    ASSERT_FALSE(result.failed);
    EXPECT_EQ(result.At(0, 0), (TRGB{7, 8, 9}));
    TReadResult resource;
    resource.params.fIsResource = true;
    Read(bytes, resource);
    EXPECT_FALSE(resource.failed);
}

TEST(BmpReader, OffsetCountsFromTheStreamsPositionAndPixelsAreConsumed) {
    TMemoryStream stream(Join({{0xEE, 0xEE, 0xEE}, kFile24, {0xDD, 0xDD}}));
    stream.SetPosition(3);
    TReadResult result;
    ReadFrom(stream, result);
    ASSERT_FALSE(result.failed);
    EXPECT_EQ(result.At(1, 1), (TRGB{4, 5, 6}));
    EXPECT_EQ(stream.GetPosition(), 73);
}

// Rows long enough to be read without the buffer, with padding at their end.
TEST(BmpReader, LongRows) {
    constexpr std::int32_t kWidth = 1501;
    TBytes bytes = MakeHeader({.width = kWidth, .height = 2});
    for (std::int32_t i = 0; i < 2 * 4504; ++i) {
        bytes.push_back(static_cast<std::uint8_t>(i * 7 + i / 256));
    }
    TReadResult result;
    Read(bytes, result);
    ASSERT_FALSE(result.failed);
    for (std::int32_t y = 0; y < 2; ++y) {
        const std::uint8_t* expected = bytes.data() + 54 + (1 - y) * 4504;
        EXPECT_EQ(std::memcmp(result.bitmap.GetScanLine(y), expected, kWidth * 3), 0) << y;
    }
}

TEST(BmpReader, StopsWhenToldAndReportsEachPercentOnce) {
    const TBytes bytes = Join({MakeHeader({.height = 4}), TBytes(16, 0x55)});
    for (const std::int32_t steps : {1, 3, 0}) {  // 0: to the end
        TMemoryStream stream(bytes);
        TReadResult result;
        test::TTestProgress progress(steps);
        ReadBMPStream(stream, result.bitmap, 0, true, result.alpha, false, false, progress.record,
                      result.params);
        EXPECT_EQ(progress.aborting, steps != 0);
        for (std::int32_t y = 0; y < 4; ++y) {
            const bool is_read = steps == 0 || 3 - y < steps;
            EXPECT_EQ(result.At(0, y), (is_read ? TRGB{0x55, 0x55, 0x55} : kBlack)) << y;
        }
        const std::vector<std::int32_t> all{25, 50, 75};
        const std::ptrdiff_t seen = steps == 0 ? 3 : steps;
        EXPECT_EQ(progress.percents, (std::vector<std::int32_t>(all.begin(), all.begin() + seen)));
    }
}

}  // namespace
}  // namespace zm
