#include "engine/codecs/jpegfilt.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "engine/codecs/jpegfilt_p.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/jpegload.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

using TBytes = std::vector<std::uint8_t>;

TBytes InsertAt(TBytes bytes, std::size_t at, const TBytes& added) {
    bytes.insert(bytes.begin() + static_cast<std::ptrdiff_t>(at), added.begin(), added.end());
    return bytes;
}

TEST(JpegReader, ColorsEqualTheLibrarysOwn) {
    const auto settings_of = [](J_COLOR_SPACE input, J_COLOR_SPACE file, int h, int v,
                                bool progressive = false, bool arithmetic = false) {
        TRawSettings settings;
        settings.input = input;
        settings.file = file;
        settings.h_factor = h;
        settings.v_factor = v;
        settings.progressive = progressive;
        settings.arithmetic = arithmetic;
        return settings;
    };
    struct {
        TRawSettings settings;
        TIOJPEGColorspace expected;
        std::int32_t samples;
    } const cases[] = {
        {settings_of(JCS_RGB, JCS_YCbCr, 2, 2), ioJPEG_YCbCr, 3},
        {settings_of(JCS_RGB, JCS_YCbCr, 2, 1), ioJPEG_YCbCr, 3},
        {settings_of(JCS_RGB, JCS_YCbCr, 1, 1, true), ioJPEG_YCbCr, 3},
        {settings_of(JCS_RGB, JCS_YCbCr, 2, 2, true, true), ioJPEG_YCbCr, 3},
        {settings_of(JCS_RGB, JCS_RGB, 1, 1), ioJPEG_RGB, 3},
        {settings_of(JCS_GRAYSCALE, JCS_GRAYSCALE, 1, 1), ioJPEG_GRAYLEV, 1},
    };
    for (const auto& one : cases) {
        const TBytes file = EncodeRawJpeg(one.settings);
        for (const TIOJPEGScale scale : {ioJPEG_FULLSIZE, ioJPEG_HALF, ioJPEG_EIGHTH}) {
            const unsigned denominator = scale == ioJPEG_FULLSIZE ? 1
                                         : scale == ioJPEG_HALF   ? 2
                                                                  : 8;
            TLoadedJpeg loaded;
            loaded.params.fJPEG_Scale = scale;
            Load(loaded, file);
            ASSERT_FALSE(loaded.progress.aborting);
            TRawJpeg raw;
            DecodeRawJpeg(file, JCS_RGB, denominator, raw);
            ExpectColors(raw, loaded.bitmap);
            TLoadedJpeg native;
            native.options.native_format = true;
            native.params.fJPEG_Scale = scale;
            Load(native, file);
            EXPECT_EQ(native.bitmap.GetPixelFormat(), one.samples == 1 ? zm8g : zm24RGB);
            EXPECT_EQ(native.bitmap.GetPixels(1, 1), RawColor(raw, 1, 1));
            EXPECT_EQ(loaded.params.fJPEG_ColorSpace, one.expected);
            EXPECT_EQ(loaded.params.fSamplesPerPixel, one.samples);
            EXPECT_EQ(loaded.params.fJPEG_Progressive, one.settings.progressive);
            EXPECT_EQ(loaded.params.fJPEG_ScaleUsed, static_cast<std::int32_t>(denominator));
            EXPECT_EQ(loaded.params.fOriginalWidth, 19);
            EXPECT_EQ(loaded.params.fOriginalHeight, 13);
            EXPECT_EQ(loaded.params.fJPEG_WarningTot, 0);
        }
    }
}

TEST(JpegReader, CmykIsTakenAsStoredInverted) {
    for (const J_COLOR_SPACE file_space : {JCS_CMYK, JCS_YCCK}) {
        TRawSettings settings;
        settings.input = JCS_CMYK;
        settings.file = file_space;
        settings.h_factor = settings.v_factor = 1;
        const TBytes file = EncodeRawJpeg(settings);
        TRawJpeg raw;
        DecodeRawJpeg(file, JCS_CMYK, 1, raw);
        const std::uint8_t* cmyk = raw.pixels.data() + (2 * 19 + 3) * 4;
        TLoadedJpeg native;
        native.options.native_format = true;
        Load(native, file);
        ASSERT_EQ(native.bitmap.GetPixelFormat(), zmCMYK);
        EXPECT_EQ(native.bitmap.GetPixels_zmCMYK(3, 2),
                  (TCMYK{cmyk[0], cmyk[1], cmyk[2], cmyk[3]}));
        EXPECT_EQ(native.params.fJPEG_ColorSpace,
                  file_space == JCS_CMYK ? ioJPEG_CMYK : ioJPEG_YCbCrK);
        EXPECT_EQ(native.params.fSamplesPerPixel, 4);
        TLoadedJpeg loaded;
        Load(loaded, file);
        ExpectColors(raw, loaded.bitmap);
        settings.flat = 255;  // no ink at all
        TLoadedJpeg white;
        Load(white, EncodeRawJpeg(settings));
        EXPECT_EQ(white.bitmap.GetPixels_zm24RGB(0, 0), (TRGB{255, 255, 255}));
    }
}

TEST(JpegReader, DensityUnits) {
    struct {
        int unit;
        int x;
        int y;
        std::int32_t dpi_x;
        std::int32_t dpi_y;
    } const cases[] = {{0, 3, 4, 3, 4}, {1, 72, 300, 72, 300}, {2, 118, 28, 299, 71}};
    for (const auto& one : cases) {
        TRawSettings settings;
        settings.density_unit = one.unit;
        settings.x_density = one.x;
        settings.y_density = one.y;
        TLoadedJpeg loaded;
        loaded.options.params_only = true;
        Load(loaded, EncodeRawJpeg(settings));
        EXPECT_EQ(loaded.params.GetDpiX(), one.dpi_x);
        EXPECT_EQ(loaded.params.GetDpiY(), one.dpi_y);
        EXPECT_TRUE(loaded.bitmap.IsEmpty());
        EXPECT_EQ(loaded.params.fWidth, 19);
        EXPECT_EQ(loaded.params.fHeight, 13);
    }
}

TEST(JpegReader, LeadingJunk) {
    const TBytes file = EncodeRawJpeg({});
    for (const std::size_t junk : {0u, 1u, 149u, 150u, 151u}) {
        TLoadedJpeg loaded;
        Load(loaded, InsertAt(file, 0, TBytes(junk, 0)));
        EXPECT_EQ(loaded.progress.aborting, junk > 149) << junk;
    }
}

TEST(JpegReader, AutomaticScale) {
    struct {
        int width;
        int height;
        std::int32_t wanted_width;
        std::int32_t wanted_height;
        std::int32_t denominator;
    } const cases[] = {
        {1600, 1200, 400, 300, 4}, {1600, 1200, 401, 300, 2}, {1600, 1200, 200, 150, 8},
        {1600, 1200, 1, 1, 8},     {1600, 1200, 801, 600, 1}, {1600, 1200, 0, 300, 1},
        {1600, 1200, 400, -1, 1},  {1599, 1200, 400, 300, 2}, {100, 100, 2000, 2000, 1}};
    for (const auto& one : cases) {
        TRawSettings settings;
        settings.width = one.width;
        settings.height = one.height;
        TLoadedJpeg loaded;
        loaded.params.fJPEG_Scale = ioJPEG_AUTOCALC;
        loaded.params.fWidth = one.wanted_width;
        loaded.params.fHeight = one.wanted_height;
        Load(loaded, EncodeRawJpeg(settings));
        EXPECT_EQ(loaded.params.fJPEG_ScaleUsed, one.denominator);
        EXPECT_EQ(loaded.bitmap.GetWidth(), (one.width + one.denominator - 1) / one.denominator);
        EXPECT_EQ(loaded.params.fWidth, one.wanted_width);  // still the wish
    }
}

TEST(JpegReader, ThumbnailWishDecodesSmallAndKeepsTheFields) {
    TRawSettings settings;
    settings.width = 700;
    settings.height = 610;
    TLoadedJpeg loaded;
    loaded.params.fJPEG_GetExifThumbnail = true;
    loaded.params.fJPEG_Scale = ioJPEG_AUTOCALC;
    loaded.params.fWidth = 11;
    loaded.params.fHeight = 12;
    Load(loaded, EncodeRawJpeg(settings));
    EXPECT_FALSE(loaded.progress.aborting);
    EXPECT_EQ(loaded.bitmap.GetWidth(), 350);
    EXPECT_EQ(loaded.params.fWidth, 11);
    EXPECT_EQ(loaded.params.fHeight, 12);
    EXPECT_TRUE(loaded.params.fJPEG_GetExifThumbnail);
}

TEST(JpegReader, MarkersSurviveLoadAndSaveInOrder) {
    TRawSettings settings;
    settings.write_markers = [](jpeg_compress_struct& encoder) {
        const auto write = [&encoder](int type, const char* text) {
            jpeg_write_marker(&encoder, type, reinterpret_cast<const JOCTET*>(text),
                              static_cast<unsigned>(std::char_traits<char>::length(text)));
        };
        write(JPEG_COM, "first");
        write(0xED, "thirteen");
        write(0xE1, "one");
        write(0xE0, "another APP0");
        write(0xEE, "not Adobe's");
        write(0xEF, "");
    };
    TLoadedJpeg loaded;
    Load(loaded, EncodeRawJpeg(settings));
    const auto texts = [](const TZmMarkerList& list) {
        std::vector<std::string> result;
        for (std::int32_t i = 0; i < list.Count(); ++i) {
            const auto data = list.GetMarkerData(i);
            result.push_back(std::to_string(list.GetMarkerType(i)) + ":" +
                             std::string(data.begin(), data.end()));
        }
        return result;
    };
    EXPECT_EQ(texts(loaded.params.fJPEG_MarkerList),
              (std::vector<std::string>{"254:first", "237:thirteen", "225:one", "224:another APP0",
                                        "238:not Adobe's", "239:"}));
    TMemoryStream saved;
    WriteJPEGStream(saved, loaded.bitmap, loaded.params, loaded.progress.record);
    TLoadedJpeg again;
    Load(again, saved.Bytes());
    EXPECT_EQ(texts(again.params.fJPEG_MarkerList),
              (std::vector<std::string>{"254:first", "237:thirteen", "225:one", "224:another APP0",
                                        "239:"}));
}

TEST(JpegReader, TruncationAtEveryByte) {
    for (const bool progressive : {false, true}) {
        for (const bool arithmetic : {false, true}) {
            TRawSettings settings;
            settings.progressive = progressive;
            settings.arithmetic = arithmetic;
            const TBytes file = EncodeRawJpeg(settings);
            for (std::size_t length = 0; length <= file.size(); ++length) {
                TLoadedJpeg loaded;
                Load(loaded, FirstBytes(file, length));
                const bool only_end_is_missing = length + 2 >= file.size();
                if (!only_end_is_missing) {
                    ASSERT_TRUE(loaded.progress.aborting)
                        << length << " of " << file.size() << " progressive " << progressive;
                } else if (!arithmetic || length == file.size()) {
                    ASSERT_FALSE(loaded.progress.aborting) << length << " of " << file.size();
                }
            }
        }
    }
}

TEST(JpegReader, ByteLimitAndStreamPosition) {
    const TBytes file = EncodeRawJpeg({});
    const auto size = static_cast<std::int64_t>(file.size());
    const TBytes two = InsertAt(file, 0, file);
    TBorrowedMemoryStream stream(two.data(), 2 * size);
    TLoadedJpeg first;
    ReadJPEGStream(stream, first.bitmap, first.options, first.progress.record, first.params);
    EXPECT_FALSE(first.progress.aborting);
    EXPECT_EQ(stream.GetPosition(), size);
    TLoadedJpeg second;
    second.options.byte_limit = size;
    ReadJPEGStream(stream, second.bitmap, second.options, second.progress.record, second.params);
    EXPECT_FALSE(second.progress.aborting);
    ExpectSamePixels(first.bitmap, second.bitmap);
    TLoadedJpeg cut;
    cut.options.byte_limit = size - 20;
    Load(cut, two);
    EXPECT_TRUE(cut.progress.aborting);
}

TEST(JpegReader, WarningsAreCounted) {
    const TBytes file = EncodeRawJpeg({});
    TLoadedJpeg loaded;
    Load(loaded, InsertAt(file, FindMarker(file, 0xDA), {1, 2, 3}));
    EXPECT_FALSE(loaded.progress.aborting);
    EXPECT_EQ(loaded.params.fJPEG_WarningTot, 1);
    EXPECT_EQ(loaded.params.fJPEG_WarningCode, 117);  // extraneous bytes before a marker
    Load(loaded, file);
    EXPECT_EQ(loaded.params.fJPEG_WarningTot, 0);
    EXPECT_EQ(loaded.params.fJPEG_WarningCode, 0);
}

TEST(JpegReader, HostileFiles) {
    TRawSettings settings;
    settings.progressive = true;
    settings.h_factor = settings.v_factor = 1;
    const TBytes file = EncodeRawJpeg(settings);
    TBytes huge = file;
    const std::size_t frame = FindMarker(file, 0xC2);
    std::fill_n(huge.begin() + static_cast<std::ptrdiff_t>(frame) + 5, 4, std::uint8_t{0xFF});
    huge[frame + 6] = huge[frame + 8] = 0x00;  // 65280 by 65280
    TLoadedJpeg refused;
    Load(refused, huge);
    EXPECT_TRUE(refused.progress.aborting);
    EXPECT_TRUE(refused.bitmap.IsEmpty());
    EXPECT_EQ(refused.params.fOriginalWidth, 65280);

    const std::uint8_t scan_marker[2] = {0xFF, 0xDA};
    const auto last_scan = std::find_end(file.begin(), file.end(), scan_marker, scan_marker + 2);
    const TBytes scan(last_scan, file.end() - 2);
    TBytes many(file.begin(), file.end() - 2);
    for (int i = 0; i < 1000; ++i) {
        many.insert(many.end(), scan.begin(), scan.end());
    }
    many.insert(many.end(), {0xFF, 0xD9});
    TLoadedJpeg stopped;
    Load(stopped, many);
    EXPECT_TRUE(stopped.progress.aborting);

    TLoadedJpeg empty;
    Load(empty, {});
    EXPECT_TRUE(empty.progress.aborting);
}

TEST(JpegMessages, NumbersAndTexts) {
    EXPECT_EQ(JpegMessageText(0), "Bogus message code ?");
    EXPECT_EQ(JpegMessageText(6), "Invalid crop request");
    EXPECT_EQ(JpegMessageText(7), "DCT coefficient out of range");
    EXPECT_EQ(JpegMessageText(54), "Not a JPEG file: starts with 0x? 0x?");
    EXPECT_EQ(JpegMessageText(68), "Application transferred too few scanlines");
    EXPECT_EQ(JpegMessageText(124), "Application transferred too many scanlines");
    EXPECT_EQ(JpegMessageText(125), "Corrupted");
    EXPECT_EQ(JpegMessageText(-1), "Corrupted");
    for (std::int32_t number = 0; number < kJpegMessageCount; ++number) {
        EXPECT_FALSE(JpegMessageText(number).empty()) << number;
        EXPECT_EQ(JpegMessageText(number).find('%'), std::string::npos) << number;
    }
}

}  // namespace
}  // namespace zm::test
