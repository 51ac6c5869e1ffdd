#include <gtest/gtest.h>
#include <zlib.h>

#include <cstring>

#include "engine/bitmap/zmmask.h"
#include "engine/codecs/pngfilt.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/codecs/pngbuilder.h"
#include "tests/codecs/pngraw.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

void DecodeRaw(const TBytes& bytes, TRawPng& raw) {
    raw = {};
    DecodeRawPng(bytes, PNG_TRANSFORM_PACKING, raw);
}

TBytes Save(TZmBitmap& bitmap, TIOParams& params, TZmMask* alpha = nullptr) {
    TMemoryStream stream;
    TTestProgress progress;
    WritePNGStream(stream, bitmap, params, alpha, progress.record);
    EXPECT_FALSE(progress.aborting);
    EXPECT_EQ(progress.percents.empty() ? 0 : progress.percents.back(), 100);
    return stream.Bytes();
}

TBytes SaveWithAlpha(TZmBitmap& bitmap, TIOParams& params) {
    TMemoryStream stream;
    TTestProgress progress;
    WritePNGStreamWithAlpha(stream, bitmap, params, progress.record);
    EXPECT_FALSE(progress.aborting);
    return stream.Bytes();
}

TBytes SaveAs(TZmBitmap& bitmap, std::int32_t samples, std::int32_t bits) {
    TIOParams params;
    params.fSamplesPerPixel = samples;
    params.fBitsPerSample = bits;
    return Save(bitmap, params);
}

void ExpectRawColors(const TRawPng& raw, TZmBitmap& bitmap) {
    ASSERT_TRUE(raw.is_good);
    ASSERT_EQ(raw.width, static_cast<png_uint_32>(bitmap.GetWidth()));
    ASSERT_EQ(raw.height, static_cast<png_uint_32>(bitmap.GetHeight()));
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
            ASSERT_EQ(RawColor(raw, x, y), bitmap.GetPixels(x, y)) << "x " << x << " y " << y;
        }
    }
}

TEST(PngWriter, LayoutBySourceAndParameters) {
    struct {
        TZmPixelFormat source;
        std::int32_t samples;
        std::int32_t bits;
        int color_type;
        int depth;
    } const cases[] = {
        {zm1g, 1, 1, PNG_COLOR_TYPE_GRAY, 1},        {zm1g, 3, 8, PNG_COLOR_TYPE_RGB, 8},
        {zm1g, 1, 8, PNG_COLOR_TYPE_GRAY, 8},        {zm8p, 1, 8, PNG_COLOR_TYPE_PALETTE, 8},
        {zm8p, 1, 4, PNG_COLOR_TYPE_PALETTE, 8},     {zm8p, 3, 8, PNG_COLOR_TYPE_RGB, 8},
        {zm8g, 1, 8, PNG_COLOR_TYPE_GRAY, 8},        {zm8g, 3, 8, PNG_COLOR_TYPE_RGB, 8},
        {zm16g, 1, 16, PNG_COLOR_TYPE_GRAY, 16},     {zm16g, 1, 12, PNG_COLOR_TYPE_GRAY, 16},
        {zm16g, 1, 8, PNG_COLOR_TYPE_GRAY, 8},       {zm24RGB, 3, 8, PNG_COLOR_TYPE_RGB, 8},
        {zm24RGB, 3, 16, PNG_COLOR_TYPE_RGB, 8},     {zm24RGB, 1, 8, PNG_COLOR_TYPE_PALETTE, 8},
        {zm24RGB, 1, 16, PNG_COLOR_TYPE_PALETTE, 8}, {zm32RGB, 4, 8, PNG_COLOR_TYPE_RGB, 8},
        {zm32RGB, 1, 8, PNG_COLOR_TYPE_PALETTE, 8},  {zmCMYK, 4, 8, PNG_COLOR_TYPE_RGB, 8},
        {zm48RGB, 3, 16, PNG_COLOR_TYPE_RGB, 8},
    };
    for (const auto& one : cases) {
        SCOPED_TRACE(testing::Message() << "format " << static_cast<int>(one.source) << " samples "
                                        << one.samples << " bits " << one.bits);
        const auto bitmap = MakeGradient(one.source, 9, 7);  // at most 63 colours
        TRawPng raw;
        DecodeRaw(SaveAs(*bitmap, one.samples, one.bits), raw);
        EXPECT_EQ(raw.color_type, one.color_type);
        EXPECT_EQ(raw.depth, one.depth);
        ExpectRawColors(raw, *bitmap);
        EXPECT_EQ(bitmap->GetPixelFormat(), one.source);
    }
}

TEST(PngWriter, SixteenBitsAreBigEndianAndOneBitLeavesTheSourceAlone) {
    TZmBitmap gray(1, 1, zm16g);
    gray.SetPixels_zm16g(0, 0, 0x1234);
    TRawPng raw;
    DecodeRaw(SaveAs(gray, 1, 16), raw);
    EXPECT_EQ(raw.rows.at(0), (TBytes{0x12, 0x34}));
    TZmBitmap colors(2, 1, zm24RGB);
    colors.SetPixels_zm24RGB(0, 0, TRGB{0, 0, 0});
    colors.SetPixels_zm24RGB(1, 0, TRGB{255, 255, 255});
    DecodeRaw(SaveAs(colors, 1, 1), raw);
    EXPECT_EQ(raw.depth, 1);
    EXPECT_EQ(raw.rows.at(0), (TBytes{0, 1}));
    EXPECT_EQ(colors.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(colors.GetPixels_zm24RGB(1, 0), (TRGB{255, 255, 255}));
}

TEST(PngWriter, ManyColorsBecomeAPaletteOf256) {
    const auto bitmap = MakeNoise(zm24RGB, 40, 40, 5);
    TRawPng raw;
    DecodeRaw(SaveAs(*bitmap, 1, 8), raw);
    EXPECT_EQ(raw.color_type, PNG_COLOR_TYPE_PALETTE);
    EXPECT_EQ(raw.palette.size(), 256u);
}

TEST(PngWriter, AlphaMaskMakesRgba) {
    const auto bitmap = MakeGradient(zm24RGB, 9, 7);
    AddNoiseAlpha(*bitmap, 3);
    TZmMask mask;
    bitmap->CopyToTZmMask(mask);
    TIOParams params;
    for (const bool interlaced : {false, true}) {
        params.fPNG_Interlaced = interlaced;
        TRawPng raw;
        const TBytes file = Save(*bitmap, params, &mask);
        EXPECT_EQ(SaveWithAlpha(*bitmap, params), file);
        DecodeRaw(file, raw);
        ASSERT_EQ(raw.color_type, PNG_COLOR_TYPE_RGB_ALPHA);
        EXPECT_EQ(raw.interlace, interlaced ? PNG_INTERLACE_ADAM7 : PNG_INTERLACE_NONE);
        ExpectRawColors(raw, *bitmap);
        for (std::int32_t y = 0; y < 7; ++y) {
            for (std::int32_t x = 0; x < 9; ++x) {
                const TBytes& row = raw.rows[static_cast<std::size_t>(y)];
                ASSERT_EQ(row[static_cast<std::size_t>(x * 4 + 3)], bitmap->GetAlpha(x, y));
            }
        }
    }
    mask.Fill(255);
    mask.SetFull(true);
    TRawPng raw;
    DecodeRaw(Save(*bitmap, params, &mask), raw);
    EXPECT_EQ(raw.color_type, PNG_COLOR_TYPE_RGB);
}

TEST(PngWriter, AlphaOfBitsAndOfAPlaneThatCoversPartOnly) {
    const auto bitmap = MakeGradient(zm24RGB, 3, 2);
    TIOParams params;
    TZmMask bits;
    ASSERT_TRUE(bits.AllocateBits(3, 2, 1));
    bits.SetPixel(1, 0, 1);
    TRawPng raw;
    DecodeRaw(Save(*bitmap, params, &bits), raw);
    const auto alpha = [&raw](std::size_t x, std::size_t y) { return raw.rows[y].at(x * 4 + 3); };
    EXPECT_EQ((TBytes{alpha(0, 0), alpha(1, 0), alpha(2, 0), alpha(1, 1)}), (TBytes{0, 255, 0, 0}));

    bitmap->ReplaceAlphaChannel(TZmBitmap::CreateAsAlphaChannel(2, 1, zmMemory));
    bitmap->GetAlphaChannelRaw()->Fill(255.0);
    DecodeRaw(SaveWithAlpha(*bitmap, params), raw);
    EXPECT_EQ(raw.color_type, PNG_COLOR_TYPE_RGB);  // the values decide, not the plane's mark
    bitmap->GetAlphaChannelRaw()->Fill(7.0);
    DecodeRaw(SaveWithAlpha(*bitmap, params), raw);
    EXPECT_EQ((TBytes{alpha(0, 0), alpha(1, 0), alpha(2, 0), alpha(1, 1)}),
              (TBytes{7, 7, 255, 255}));
}

TEST(PngWriter, PaletteWithAlphaKeepsEntryZeroForIt) {
    for (const TZmPixelFormat format : {zm24RGB, zm32RGB, zm8p}) {
        SCOPED_TRACE(static_cast<int>(format));
        const auto bitmap = MakeGradient(format, 9, 7);
        TZmMask mask;
        ASSERT_TRUE(mask.AllocateBits(9, 7, 8));
        mask.Fill(255);
        mask.SetPixel(4, 2, 0);
        mask.SetPixel(5, 2, 254);
        mask.SetFull(false);
        TIOParams params;
        params.fSamplesPerPixel = 1;
        params.fPNG_Background = TRGB{1, 2, 3};
        TRawPng raw;
        DecodeRaw(Save(*bitmap, params, &mask), raw);
        ASSERT_EQ(raw.color_type, PNG_COLOR_TYPE_PALETTE);
        EXPECT_EQ(raw.transparency, (TBytes{0}));
        EXPECT_EQ(raw.palette.at(0), (TRGB{1, 2, 3}));
        EXPECT_EQ(raw.background.index, 0);
        EXPECT_EQ(raw.rows[2][4], 0);
        EXPECT_EQ(raw.rows[2][5], 0);
        EXPECT_EQ(RawColor(raw, 3, 2), bitmap->GetPixels(3, 2));
        EXPECT_NE(raw.rows[2][3], 0);
    }
}

/// Greys in no order: an index that is worked out from the grey value would be another entry.
TEST(PngWriter, GreyPalettesWithAlphaKeepTheirColors) {
    TZmBitmap bitmap(4, 1, zm8p);
    constexpr std::uint8_t kGreys[] = {255, 0, 128, 77};
    for (std::int32_t i = 0; i < 256; ++i) {
        const std::uint8_t grey = i == 255 ? 77 : kGreys[i % 3];
        bitmap.SetPalette(i, TRGB{grey, grey, grey});
    }
    bitmap.SetPixels_zm8(1, 0, 1);
    bitmap.SetPixels_zm8(2, 0, 254);
    bitmap.SetPixels_zm8(3, 0, 255);  // no entry is left for it: the nearest, 128
    bitmap.SetAlpha(0, 0, 0);
    TIOParams params;
    params.fSamplesPerPixel = 1;
    TRawPng raw;
    DecodeRaw(SaveWithAlpha(bitmap, params), raw);
    EXPECT_EQ(raw.rows.at(0), (TBytes{0, 2, 255, 3}));
    EXPECT_EQ(RawColor(raw, 1, 0), (TRGB{0, 0, 0}));
    EXPECT_EQ(RawColor(raw, 2, 0), (TRGB{128, 128, 128}));
    EXPECT_EQ(RawColor(raw, 3, 0), (TRGB{128, 128, 128}));
}

TEST(PngWriter, ResolutionBackgroundAndTexts) {
    const auto bitmap = MakeGradient(zm24RGB, 3, 2);
    TIOParams params;
    params.SetDpiX(300);
    params.SetDpiY(96);
    params.fPNG_Background = TRGB{10, 20, 30};
    params.fPNG_TextKeys = {"Title", "", "Wide", "Author", "Changed", "without a value"};
    params.fPNG_TextValues = {"first", "no key", "\xC3\xA4", "second", "anew"};
    params.fPNG_Chunks.Add({kPngChunkText, "Wide", "en", "W", {0xC3, 0xA4}});
    params.fPNG_Chunks.Add({kPngChunkText, "Changed", "en", "", {'o', 'l', 'd'}});
    TRawPng raw;
    DecodeRaw(Save(*bitmap, params), raw);
    ASSERT_TRUE(raw.is_good);
    EXPECT_EQ(raw.x_per_meter, 11811u);
    EXPECT_EQ(raw.y_per_meter, 3780u);
    ASSERT_TRUE(raw.has_background);
    EXPECT_EQ(raw.background.red, 30);
    EXPECT_EQ(raw.background.blue, 10);
    EXPECT_EQ(raw.texts,
              (TStringList{"Title=first", "Wide=\xC3\xA4@en", "Author=second", "Changed=anew"}));
}

/// Filter bytes of the rows of a file that is not interlaced.
TBytes FilterBytes(const TBytes& file, std::size_t row_bytes, std::size_t rows) {
    TBytes packed;
    for (std::size_t at = 8; at + 12 <= file.size();) {
        const std::size_t length = static_cast<std::size_t>(file[at]) << 24 |
                                   static_cast<std::size_t>(file[at + 1]) << 16 |
                                   static_cast<std::size_t>(file[at + 2]) << 8 | file[at + 3];
        if (std::memcmp(file.data() + at + 4, "IDAT", 4) == 0) {
            packed.insert(packed.end(), file.begin() + static_cast<std::ptrdiff_t>(at + 8),
                          file.begin() + static_cast<std::ptrdiff_t>(at + 8 + length));
        }
        at += length + 12;
    }
    TBytes raw((row_bytes + 1) * rows);
    uLongf size = static_cast<uLongf>(raw.size());
    EXPECT_EQ(uncompress(raw.data(), &size, packed.data(), static_cast<uLong>(packed.size())),
              Z_OK);
    TBytes filters;
    for (std::size_t row = 0; row < rows; ++row) {
        filters.push_back(raw[row * (row_bytes + 1)]);
    }
    return filters;
}

TEST(PngWriter, FilterAndCompressionLevel) {
    const auto bitmap = MakeGradient(zm24RGB, 64, 40);
    struct {
        TIOPNGFilter filter;
        std::uint8_t byte;
    } const cases[] = {{ioPNG_FILTER_NONE, 0},
                       {ioPNG_FILTER_SUB, 1},
                       {ioPNG_FILTER_UP, 2},
                       {ioPNG_FILTER_AVG, 3},
                       {ioPNG_FILTER_PAETH, 4}};
    for (const auto& one : cases) {
        TIOParams params;
        params.fPNG_Filter = one.filter;
        const TBytes filters = FilterBytes(Save(*bitmap, params), 64 * 3, 40);
        EXPECT_EQ(TBytes(filters.begin() + 1, filters.end()), TBytes(39, one.byte));
    }
    TIOParams params;
    params.fPNG_Filter = ioPNG_FILTER_ALL;
    const TBytes filters = FilterBytes(Save(*bitmap, params), 64 * 3, 40);
    EXPECT_NE(filters, TBytes(40, filters[0]));  // the library chooses row by row
    TIOParams stored;
    stored.fPNG_Compression = 0;
    EXPECT_GT(Save(*bitmap, stored).size(), 64u * 40 * 3);
    stored.fPNG_Compression = 1000;
    EXPECT_LT(Save(*bitmap, stored).size(), 64u * 40 * 3);
}

TEST(PngWriter, FullAndRaisingStreamsAndEmptyBitmapsEndAsFailure) {
    const auto bitmap = MakeNoise(zm24RGB, 30, 30, 1);
    TIOParams params;
    const auto size = static_cast<std::int64_t>(Save(*bitmap, params).size());
    const auto expect_failure = [&params](TStream& stream, TZmBitmap& image) {
        TTestProgress progress;
        EXPECT_NO_THROW(WritePNGStream(stream, image, params, nullptr, progress.record));
        EXPECT_TRUE(progress.aborting);
    };
    for (const bool raises : {false, true}) {
        for (std::int64_t room = 0; room < size; room += 53) {
            TFullStream stream(room, raises);
            expect_failure(stream, *bitmap);
        }
    }
    TZmBitmap empty;
    TMemoryStream stream;
    expect_failure(stream, empty);
}

}  // namespace
}  // namespace zm::test
