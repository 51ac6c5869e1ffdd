#include <gtest/gtest.h>
#include <png.h>
#include <zlib.h>

#include <csetjmp>
#include <cstring>
#include <functional>

#include "engine/bitmap/zmmask.h"
#include "engine/codecs/pngfilt.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/codecs/pngbuilder.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

/// A file as the PNG library by itself sees it, no transformation but for unpacked bits.
struct TRawPng {
    bool is_good = false;
    png_uint_32 width = 0;
    png_uint_32 height = 0;
    int depth = 0;
    int color_type = 0;
    int interlace = 0;
    std::vector<TBytes> rows;
    std::vector<TRGB> palette;
    TBytes transparency;
    png_uint_32 x_per_meter = 0;
    png_uint_32 y_per_meter = 0;
    png_color_16 background = {};
    bool has_background = false;
    TStringList keys;
    TStringList values;
};

struct TRawSource {
    const TBytes* bytes;
    std::size_t position;
};

void ReadRawBytes(png_structp png, png_bytep target, std::size_t count) {
    auto* source = static_cast<TRawSource*>(png_get_io_ptr(png));
    if (count > source->bytes->size() - source->position) {
        png_error(png, "end");
    }
    std::memcpy(target, source->bytes->data() + source->position, count);
    source->position += count;
}

void TakeInfo(png_structp png, png_infop info, TRawPng& raw) {
    png_get_IHDR(png, info, &raw.width, &raw.height, &raw.depth, &raw.color_type, &raw.interlace,
                 nullptr, nullptr);
    png_colorp palette = nullptr;
    int count = 0;
    if (png_get_PLTE(png, info, &palette, &count) != 0) {
        for (int i = 0; i < count; ++i) {
            raw.palette.push_back(TRGB{palette[i].blue, palette[i].green, palette[i].red});
        }
    }
    png_bytep transparency = nullptr;
    if (png_get_tRNS(png, info, &transparency, &count, nullptr) != 0 && transparency != nullptr) {
        raw.transparency.assign(transparency, transparency + count);
    }
    raw.x_per_meter = png_get_x_pixels_per_meter(png, info);
    raw.y_per_meter = png_get_y_pixels_per_meter(png, info);
    png_color_16p background = nullptr;
    if (png_get_bKGD(png, info, &background) != 0) {
        raw.background = *background;
        raw.has_background = true;
    }
    png_textp texts = nullptr;
    const int text_count = png_get_text(png, info, &texts, nullptr);
    for (int i = 0; i < text_count; ++i) {
        raw.keys.emplace_back(texts[i].key);
        raw.values.emplace_back(texts[i].text);
    }
}

void DecodeRaw(const TBytes& bytes, TRawPng& raw) {
    TRawSource source{&bytes, 0};
    png_structp png = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
    png_infop info = png_create_info_struct(png);
    if (setjmp(png_jmpbuf(png)) == 0) {
        png_set_read_fn(png, &source, ReadRawBytes);
        png_read_png(png, info, PNG_TRANSFORM_PACKING, nullptr);
        TakeInfo(png, info, raw);
        raw.depth = bytes[24];  // of the file; the library tells that of the unpacked rows
        png_bytepp rows = png_get_rows(png, info);
        for (png_uint_32 y = 0; y < raw.height; ++y) {
            raw.rows.emplace_back(rows[y], rows[y] + png_get_rowbytes(png, info));
        }
        raw.is_good = true;
    }
    png_destroy_read_struct(&png, &info, nullptr);
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

TRGB RawColor(const TRawPng& raw, std::size_t x, std::size_t y) {
    const TBytes& row = raw.rows[y];
    switch (raw.color_type) {
        case PNG_COLOR_TYPE_PALETTE: return raw.palette[row[x]];
        case PNG_COLOR_TYPE_GRAY: {
            const std::uint8_t value = raw.depth == 16  ? row[x * 2]
                                       : raw.depth == 1 ? static_cast<std::uint8_t>(row[x] * 255)
                                                        : row[x];
            return TRGB{value, value, value};
        }
        default: {
            const std::size_t channels = raw.color_type == PNG_COLOR_TYPE_RGB ? 3 : 4;
            const std::uint8_t* pixel = row.data() + x * channels;
            return TRGB{pixel[2], pixel[1], pixel[0]};
        }
    }
}

void ExpectRawColors(const TRawPng& raw, TZmBitmap& bitmap) {
    ASSERT_TRUE(raw.is_good);
    ASSERT_EQ(raw.width, static_cast<png_uint_32>(bitmap.GetWidth()));
    ASSERT_EQ(raw.height, static_cast<png_uint_32>(bitmap.GetHeight()));
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
            ASSERT_EQ(RawColor(raw, static_cast<std::size_t>(x), static_cast<std::size_t>(y)),
                      bitmap.GetPixels(x, y))
                << "x " << x << " y " << y;
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
        {zmCMYK, 4, 8, PNG_COLOR_TYPE_RGB, 8},       {zm48RGB, 3, 16, PNG_COLOR_TYPE_RGB, 8},
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

TEST(PngWriter, SixteenBitRowsAreBigEndian) {
    TZmBitmap bitmap(1, 1, zm16g);
    bitmap.SetPixels_zm16g(0, 0, 0x1234);
    TRawPng raw;
    DecodeRaw(SaveAs(bitmap, 1, 16), raw);
    EXPECT_EQ(raw.rows.at(0), (TBytes{0x12, 0x34}));
}

TEST(PngWriter, OneBitFromColorsLeavesTheSourceAlone) {
    TZmBitmap bitmap(2, 1, zm24RGB);
    bitmap.SetPixels_zm24RGB(0, 0, TRGB{0, 0, 0});
    bitmap.SetPixels_zm24RGB(1, 0, TRGB{255, 255, 255});
    TRawPng raw;
    DecodeRaw(SaveAs(bitmap, 1, 1), raw);
    EXPECT_EQ(raw.depth, 1);
    EXPECT_EQ(raw.rows.at(0), (TBytes{0, 1}));
    EXPECT_EQ(bitmap.GetPixelFormat(), zm24RGB);
    EXPECT_EQ(bitmap.GetPixels_zm24RGB(1, 0), (TRGB{255, 255, 255}));
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
    DecodeRaw(SaveWithAlpha(*bitmap, params), raw = {});
    EXPECT_EQ(raw.color_type, PNG_COLOR_TYPE_RGB);  // the values decide, not the plane's mark
    bitmap->GetAlphaChannelRaw()->Fill(7.0);
    DecodeRaw(SaveWithAlpha(*bitmap, params), raw = {});
    EXPECT_EQ((TBytes{alpha(0, 0), alpha(1, 0), alpha(2, 0), alpha(1, 1)}),
              (TBytes{7, 7, 255, 255}));
}

TEST(PngWriter, PaletteWithAlphaKeepsEntryZeroForIt) {
    for (const TZmPixelFormat format : {zm24RGB, zm8p}) {
        const auto bitmap = MakeGradient(format, 9, 7);
        TZmMask mask;
        ASSERT_TRUE(mask.AllocateBits(9, 7, 8));
        mask.Fill(255);
        mask.SetPixel(4, 2, 0);
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
        EXPECT_EQ(RawColor(raw, 3, 2), bitmap->GetPixels(3, 2));
        EXPECT_NE(raw.rows[2][3], 0);
    }
}

TEST(PngWriter, ResolutionBackgroundAndTexts) {
    const auto bitmap = MakeGradient(zm24RGB, 3, 2);
    TIOParams params;
    params.SetDpiX(300);
    params.SetDpiY(96);
    params.fPNG_Background = TRGB{10, 20, 30};
    params.fPNG_TextKeys = {"Title", "", "Author", "without a value"};
    params.fPNG_TextValues = {"first", "no key", "second"};
    TRawPng raw;
    DecodeRaw(Save(*bitmap, params), raw);
    ASSERT_TRUE(raw.is_good);
    EXPECT_EQ(raw.x_per_meter, 11811u);
    EXPECT_EQ(raw.y_per_meter, 3780u);
    ASSERT_TRUE(raw.has_background);
    EXPECT_EQ(raw.background.red, 30);
    EXPECT_EQ(raw.background.blue, 10);
    EXPECT_EQ(raw.keys, (TStringList{"Title", "Author"}));
    EXPECT_EQ(raw.values, (TStringList{"first", "second"}));
    TIOParams fresh;
    TRawPng plain;
    DecodeRaw(Save(*bitmap, fresh), plain);
    EXPECT_TRUE(plain.keys.empty());
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

TEST(PngWriter, FullAndRaisingStreamsEndAsFailure) {
    const auto bitmap = MakeNoise(zm24RGB, 30, 30, 1);
    TIOParams params;
    const auto size = static_cast<std::int64_t>(Save(*bitmap, params).size());
    for (const bool raises : {false, true}) {
        for (std::int64_t room = 0; room < size; room += 53) {
            TFullStream stream(room, raises);
            TTestProgress progress;
            EXPECT_NO_THROW(WritePNGStream(stream, *bitmap, params, nullptr, progress.record));
            EXPECT_TRUE(progress.aborting) << room;
        }
    }
}

TEST(PngWriter, AnEmptyBitmapFails) {
    TZmBitmap bitmap;
    TIOParams params;
    TMemoryStream stream;
    TTestProgress progress;
    WritePNGStream(stream, bitmap, params, nullptr, progress.record);
    EXPECT_TRUE(progress.aborting);
}

}  // namespace
}  // namespace zm::test
