#include <gtest/gtest.h>

#include <cstdlib>

#include "engine/codecs/jpegfilt.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/codecs/jpegraw.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

using TBytes = std::vector<std::uint8_t>;

TBytes Save(TZmBitmap& bitmap, TIOParams& params) {
    TMemoryStream stream;
    TTestProgress progress;
    WriteJPEGStream(stream, bitmap, params, progress.record);
    EXPECT_FALSE(progress.aborting);
    return stream.Bytes();
}

/// A picture without sharp edges, so that loss stays small.
void MakeSmooth(TZmBitmap& bitmap) {
    ASSERT_TRUE(bitmap.Allocate(33, 21, zm24RGB));
    for (std::int32_t y = 0; y < 21; ++y) {
        for (std::int32_t x = 0; x < 33; ++x) {
            bitmap.SetPixels_zm24RGB(
                x, y,
                TRGB{static_cast<std::uint8_t>(40 + x * 4), static_cast<std::uint8_t>(200 - y * 5),
                     static_cast<std::uint8_t>(90 + x * 2 + y)});
        }
    }
}

TEST(JpegWriter, ColorSpacesAsAnotherDecoderSeesThem) {
    struct {
        TIOJPEGColorspace wanted;
        J_COLOR_SPACE file;
        J_COLOR_SPACE decoded;
        bool jfif;
        bool adobe;
    } const cases[] = {{ioJPEG_RGB, JCS_RGB, JCS_RGB, false, true},
                       {ioJPEG_GRAYLEV, JCS_GRAYSCALE, JCS_GRAYSCALE, true, false},
                       {ioJPEG_YCbCr, JCS_YCbCr, JCS_RGB, true, false},
                       {ioJPEG_CMYK, JCS_CMYK, JCS_CMYK, false, true},
                       {ioJPEG_YCbCrK, JCS_YCCK, JCS_CMYK, false, true}};
    TZmBitmap bitmap;
    MakeSmooth(bitmap);
    for (const auto& one : cases) {
        SCOPED_TRACE(static_cast<int>(one.wanted));
        TIOParams params;
        params.fJPEG_ColorSpace = one.wanted;
        params.fJPEG_Quality = 100;
        params.fJPEG_CromaSubsampling = ioJPEG_NONE;
        TRawJpeg raw;
        DecodeRawJpeg(Save(bitmap, params), one.decoded, 1, raw);
        ASSERT_TRUE(raw.is_good);
        EXPECT_EQ(raw.color_space, one.file);
        EXPECT_EQ(raw.has_jfif, one.jfif);
        EXPECT_EQ(raw.has_adobe, one.adobe);
        for (std::int32_t y = 0; y < 21; ++y) {
            for (std::int32_t x = 0; x < 33; ++x) {
                TRGB expected = bitmap.GetPixels_zm24RGB(x, y);
                if (one.wanted == ioJPEG_GRAYLEV) {
                    const int gray = (expected.r * 21 + expected.g * 71 + expected.b * 8) / 100;
                    expected.r = expected.g = expected.b = static_cast<std::uint8_t>(gray);
                }
                const TRGB color = RawColor(raw, x, y);
                ASSERT_LE(std::abs(color.r - expected.r), 4) << x << " " << y;
                ASSERT_LE(std::abs(color.g - expected.g), 4) << x << " " << y;
                ASSERT_LE(std::abs(color.b - expected.b), 4) << x << " " << y;
            }
        }
    }
}

TEST(JpegWriter, SubsamplingQualityProgressionAndDensity) {
    TZmBitmap bitmap;
    MakeSmooth(bitmap);
    struct {
        TIOJPEGCromaSubsampling subsampling;
        int h;
        int v;
    } const cases[] = {{ioJPEG_MEDIUM, 2, 1}, {ioJPEG_HIGH, 2, 2}, {ioJPEG_NONE, 1, 1}};
    for (const auto& one : cases) {
        TIOParams params;
        params.fJPEG_CromaSubsampling = one.subsampling;
        params.fJPEG_Quality = 100;
        params.fJPEG_Progressive = one.h == 1;
        params.SetDpiX(72);
        params.SetDpiY(0);
        TRawJpeg raw;
        DecodeRawJpeg(Save(bitmap, params), JCS_RGB, 1, raw);
        EXPECT_EQ(raw.h_factors[0], one.h);
        EXPECT_EQ(raw.v_factors[0], one.v);
        EXPECT_EQ(raw.h_factors[1] * raw.v_factors[1] * raw.h_factors[2] * raw.v_factors[2], 1);
        EXPECT_EQ(raw.first_quantizer, 1);
        EXPECT_EQ(raw.progressive, one.h == 1);
        EXPECT_EQ(raw.density_unit, 1);
        EXPECT_EQ(raw.x_density, 72);
        EXPECT_EQ(raw.y_density, 300);
    }
    TIOParams params;  // quality 80 scales the first luma step of 16 by 40 percent
    TRawJpeg raw;
    DecodeRawJpeg(Save(bitmap, params), JCS_RGB, 1, raw);
    EXPECT_EQ(raw.first_quantizer, 6);
}

TEST(JpegWriter, HuffmanSmoothingAndDctMethodReachTheLibrary) {
    const auto bitmap = MakeNoise(zm24RGB, 64, 64, 9);
    TIOParams params;
    const TBytes plain = Save(*bitmap, params);
    params.fJPEG_OptimalHuffman = true;
    EXPECT_LT(Save(*bitmap, params).size(), plain.size());
    params.fJPEG_OptimalHuffman = false;
    params.fJPEG_Smooth = 100;
    EXPECT_LT(Save(*bitmap, params).size(), plain.size());
    params.fJPEG_Smooth = 0;
    params.fJPEG_DCTMethod = ioJPEG_FLOAT;
    EXPECT_NE(Save(*bitmap, params), plain);
}

TEST(JpegWriter, SourcesOfEveryFormatGiveTheFileOfTheirColors) {
    for (const TZmPixelFormat format :
         {zm1g, zm8p, zm8g, zm16g, zm24RGB, zm32f, zmCMYK, zm48RGB, zmCIELab, zm32RGB}) {
        SCOPED_TRACE(static_cast<int>(format));
        const auto bitmap = MakeGradient(format, 16, 16);
        const auto before = MakeGradient(format, 16, 16);
        TZmBitmap colors(*bitmap);
        ASSERT_TRUE(colors.SetPixelFormat(zm24RGB));
        for (const TIOJPEGColorspace space : {ioJPEG_GRAYLEV, ioJPEG_YCbCr, ioJPEG_CMYK}) {
            TIOParams params;
            params.fJPEG_ColorSpace = space;
            EXPECT_EQ(Save(*bitmap, params), Save(colors, params)) << space;
        }
        ExpectSamePixels(*before, *bitmap);
    }
}

TEST(JpegWriter, AlphaIsLeftOutAndKept) {
    const auto bitmap = MakeGradient(zm24RGB, 16, 16);
    TIOParams params;
    const TBytes opaque = Save(*bitmap, params);
    AddNoiseAlpha(*bitmap, 4);
    const std::uint8_t alpha = bitmap->GetAlpha(5, 5);
    EXPECT_EQ(Save(*bitmap, params), opaque);
    ASSERT_TRUE(bitmap->HasAlphaChannel());
    EXPECT_EQ(bitmap->GetAlpha(5, 5), alpha);
}

TEST(JpegWriter, AnEmptyBitmapIsNotWritten) {
    TZmBitmap bitmap;
    TIOParams params;
    EXPECT_TRUE(Save(bitmap, params).empty());
}

TEST(JpegWriter, LibraryErrorsAreRaisedWithTheirText) {
    const auto expect_raised = [](TZmBitmap& bitmap, TIOParams& params, const char* text) {
        TMemoryStream stream;
        TTestProgress progress;
        try {
            WriteJPEGStream(stream, bitmap, params, progress.record);
            ADD_FAILURE() << "nothing raised: " << text;
        } catch (const EZmJpegException& error) {
            EXPECT_STREQ(error.what(), text);
        }
    };
    TZmBitmap wide(65501, 1, zm8g);
    TIOParams params;
    expect_raised(wide, params, "Maximum supported image dimension is ? pixels");
    TZmBitmap small(1, 1, zm8g);
    params.fJPEG_MarkerList.AddMarker(kMarkerComment, TBytes(65534));
    expect_raised(small, params, "Bogus marker length");
}

TEST(JpegWriter, FullAndRaisingStreamsEndAsFailure) {
    const auto bitmap = MakeNoise(zm24RGB, 400, 400, 2);
    TIOParams params;
    const auto size = static_cast<std::int64_t>(Save(*bitmap, params).size());
    ASSERT_GT(size, 65536);  // more than one buffer
    for (const bool raises : {false, true}) {
        for (const std::int64_t room : {std::int64_t{0}, std::int64_t{65536}, size - 1}) {
            TFullStream stream(room, raises);
            TTestProgress progress;
            EXPECT_NO_THROW(WriteJPEGStream(stream, *bitmap, params, progress.record));
            EXPECT_TRUE(progress.aborting) << room;
        }
    }
}

}  // namespace
}  // namespace zm::test
