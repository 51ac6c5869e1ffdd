#include <gtest/gtest.h>
#include <png.h>

#include <algorithm>
#include <csetjmp>
#include <set>
#include <string>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/jpegraw.h"
#include "tests/support/testfiles.h"

// Real files of the formats that this room reads, where the folder of sample files is there. The
// files marked damaged only have to come back, whatever the result.
namespace zm::test {
namespace {

using TBytes = std::vector<std::uint8_t>;

bool IsDamaged(const CorpusEntry& entry) {
    return entry.format.starts_with("malformed");
}

/// What the PNG library makes of a file when it expands everything by itself.
struct TExpandedPng {
    bool is_good = false;
    png_uint_32 width = 0;
    std::size_t channels = 0;
    std::vector<TBytes> rows;
};

void DecodeExpanded(const std::filesystem::path& path, TExpandedPng& png) {
    const TBytes bytes = ReadFileBytes(path);
    struct TSource {
        const std::uint8_t* at;
        std::size_t left;
    } source{bytes.data(), bytes.size()};
    png_structp library = png_create_read_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr,
                                                 [](png_structp, png_const_charp) {});
    png_infop info = png_create_info_struct(library);
    if (setjmp(png_jmpbuf(library)) == 0) {
        png_set_read_fn(library, &source, [](png_structp self, png_bytep target, size_t count) {
            auto* from = static_cast<TSource*>(png_get_io_ptr(self));
            if (count > from->left) {
                png_error(self, "end");
            }
            std::copy(from->at, from->at + count, target);
            from->at += count;
            from->left -= count;
        });
        png_read_png(library, info,
                     PNG_TRANSFORM_EXPAND | PNG_TRANSFORM_STRIP_16 | PNG_TRANSFORM_GRAY_TO_RGB,
                     nullptr);
        png.width = png_get_image_width(library, info);
        png.channels = png_get_channels(library, info);
        png_bytepp rows = png_get_rows(library, info);
        for (png_uint_32 y = 0; y < png_get_image_height(library, info); ++y) {
            png.rows.emplace_back(rows[y], rows[y] + png.width * png.channels);
        }
        png.is_good = true;
    }
    png_destroy_read_struct(&library, &info, nullptr);
}

void ExpectPngPixels(const CorpusEntry& entry, TZmBitmap& bitmap) {
    TExpandedPng png;
    DecodeExpanded(entry.path, png);
    ASSERT_TRUE(png.is_good);
    const bool has_alpha = png.channels == 4 && bitmap.GetPixelFormat() != zm1g;
    EXPECT_EQ(bitmap.HasAlphaChannel(), has_alpha);
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        const std::uint8_t* pixel = png.rows.at(static_cast<std::size_t>(y)).data();
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x, pixel += png.channels) {
            ASSERT_EQ(bitmap.GetPixels(x, y), (TRGB{pixel[2], pixel[1], pixel[0]}))
                << "x " << x << " y " << y;
            if (has_alpha) {
                ASSERT_EQ(bitmap.GetAlpha(x, y), pixel[3]) << "x " << x << " y " << y;
            }
        }
    }
}

void ExpectJpegPixels(const TRawJpeg& raw, TZmBitmap& bitmap) {
    const bool is_cmyk = raw.components == 4;
    ASSERT_TRUE(raw.is_good);
    const std::uint8_t* pixel = raw.pixels.data();
    for (std::int32_t y = 0; y < raw.height; ++y) {
        for (std::int32_t x = 0; x < raw.width; ++x, pixel += is_cmyk ? 4 : 3) {
            const auto channel = [pixel, is_cmyk](int i) {
                return static_cast<std::uint8_t>(is_cmyk ? pixel[3] * pixel[i] / 255 : pixel[i]);
            };
            ASSERT_EQ(bitmap.GetPixels_zm24RGB(x, y), (TRGB{channel(2), channel(1), channel(0)}))
                << "x " << x << " y " << y;
        }
    }
}

TEST(Corpus, FilesLoadAsAnotherDecoderSeesThem) {
    if (!CorpusFolder()) {
        GTEST_SKIP() << "the folder of sample files is not there";
    }
    const std::set<std::string> formats = {"bmp", "jpeg", "png"};
    int files = 0;
    for (const CorpusEntry& entry : CorpusEntries()) {
        if (!formats.contains(entry.format)) {
            continue;
        }
        SCOPED_TRACE(entry.path.string());
        TZmBitmap bitmap;
        TIOParams params;
        const bool is_read = bitmap.Read(EngineName(entry.path), &params, /*check_unknown=*/true);
        TRawJpeg jpeg;
        if (entry.format == "jpeg") {
            const bool is_cmyk = params.fSamplesPerPixel == 4;
            DecodeRawJpeg(ReadFileBytes(entry.path), is_cmyk ? JCS_CMYK : JCS_RGB, 1, jpeg);
        }
        EXPECT_EQ(is_read, !jpeg.ends_early);
        if (!is_read) {
            continue;
        }
        ++files;
        EXPECT_EQ(bitmap.GetWidth(), entry.width);
        EXPECT_EQ(bitmap.GetHeight(), entry.height);
        if (entry.format == "png") {
            ExpectPngPixels(entry, bitmap);
        } else if (entry.format == "jpeg") {
            ExpectJpegPixels(jpeg, bitmap);
        }
    }
    EXPECT_GT(files, 0);
}

TEST(Corpus, DamagedFilesComeBack) {
    if (!CorpusFolder()) {
        GTEST_SKIP() << "the folder of sample files is not there";
    }
    for (const CorpusEntry& entry : CorpusEntries()) {
        if (!IsDamaged(entry)) {
            continue;
        }
        SCOPED_TRACE(entry.path.string());
        const TBytes bytes = ReadFileBytes(entry.path);
        for (const std::int32_t type : {ioBMP, ioJPEG, ioPNG}) {
            TZmBitmap bitmap;
            TIOParams params;
            const bool is_read =
                bitmap.Read(bytes.data(), static_cast<std::int64_t>(bytes.size()), type, &params);
            EXPECT_TRUE(!is_read || !bitmap.IsEmpty());
        }
    }
}

}  // namespace
}  // namespace zm::test
