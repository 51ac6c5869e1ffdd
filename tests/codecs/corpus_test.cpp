#include <gtest/gtest.h>

#include <set>
#include <string>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/jpegload.h"
#include "tests/codecs/pngraw.h"
#include "tests/support/testfiles.h"

// Real files of the formats that this room reads, where the folder of sample files is there. The
// files marked damaged only have to come back, whatever the result.
namespace zm::test {
namespace {

using TBytes = std::vector<std::uint8_t>;

bool IsDamaged(const CorpusEntry& entry) {
    return entry.format.starts_with("malformed");
}

void ExpectPngPixels(const CorpusEntry& entry, TZmBitmap& bitmap) {
    TRawPng png;
    DecodeRawPng(ReadFileBytes(entry.path),
                 PNG_TRANSFORM_EXPAND | PNG_TRANSFORM_STRIP_16 | PNG_TRANSFORM_GRAY_TO_RGB, png);
    ASSERT_TRUE(png.is_good);
    const bool has_alpha = png.channels == 4 && bitmap.GetPixelFormat() != zm1g;
    EXPECT_EQ(bitmap.HasAlphaChannel(), has_alpha);
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        const std::uint8_t* row = png.rows.at(static_cast<std::size_t>(y)).data();
        for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
            ASSERT_EQ(bitmap.GetPixels(x, y), RawColor(png, x, y)) << "x " << x << " y " << y;
            if (has_alpha) {
                ASSERT_EQ(bitmap.GetAlpha(x, y), row[x * 4 + 3]) << "x " << x << " y " << y;
            }
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
            ExpectColors(jpeg, bitmap);
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
