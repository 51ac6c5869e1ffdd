#include <gtest/gtest.h>

#include <cstdlib>
#include <set>
#include <string>

#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmioparams.h"
#include "engine/io/zmioparams_fields_p.h"
#include "tests/support/testfiles.h"

namespace zm {
namespace {

class IOParamsProperties : public ::testing::Test {
protected:
    void TearDown() override { DestroySingletonInstance(); }
    std::string Get(const std::u16string& key) { return Utf8FromUtf16(params_.GetProperty(key)); }
    /// Sets and reads back.
    std::string SetGet(const std::u16string& key, const std::u16string& value) {
        params_.SetProperty(key, value);
        return Get(key);
    }
    TIOParams params_;
};

TEST_F(IOParamsProperties, TheTableIsClosed) {
    std::set<std::string> readable;
    std::set<std::string> writable;
    for (const auto rows : {TZmIOFieldTable::Stored(), TZmIOFieldTable::NotStored()}) {
        for (const TZmIOField& field : rows) {
            if (field.use == kNoKey) {
                continue;
            }
            EXPECT_TRUE(readable.insert(KeyOfField(field)).second) << KeyOfField(field);
            if (field.use == kReadWriteKey) {
                writable.insert(KeyOfField(field));
            }
        }
    }
    EXPECT_EQ(295u, readable.size());
    EXPECT_EQ(270u, writable.size());
    for (const char* key : {"JPEG_WARNINGTOT", "JPEG_WARNINGCODE", "JPEG_SCALE_USED", "ABORTING"}) {
        EXPECT_TRUE(readable.contains(key) && !writable.contains(key)) << key;
    }
    for (const char* key :
         {"XMP_INFO", "ENABLEADJUSTORIENTATION", "DCX_IMAGEINDEX", "AVI_FRAMEDELAYTIME",
          "BMPRAW_ROWALIGN", "PSD_SELECTLAYER", "HDP_LOSSLESS", "TGA_DATE", "SVG_IMAGECOMPRESSION",
          "EXIF_XPSUBJECT", "EXIF_GPSDESTDISTANCE", "EXIF_YCBCRCOEFFICIENTS2"}) {
        EXPECT_TRUE(writable.contains(key)) << key;
    }
}

TEST_F(IOParamsProperties, TextFormsOfTheTypes) {
    struct TRow {
        const char16_t* key;
        const char16_t* value;
        const char* expected;
    };
    const TRow rows[] = {
        {u"jpeg_Quality", u"  90 ", "90"},
        {u"JPEG_QUALITY", u"4x", "90"},
        {u"JPEG_QUALITY", u"2147483648", "90"},
        {u"TIFF_XPOS", u"-7", "-7"},
        {u"JPEG_PROGRESSIVE", u"TRUE", "true"},
        {u"JPEG_PROGRESSIVE", u"0", "false"},
        {u"JPEG_PROGRESSIVE", u"yes", "false"},
        {u"J2000_RATE", u" 0.5 ", "0.5"},
        {u"J2000_RATE", u"0,5", "0.5"},
        {u"JPEG_COLORSPACE", u"3", "3"},
        {u"JPEG_COLORSPACE", u"5", "3"},
        {u"JPEG_COLORSPACE", u"-1", "3"},
        {u"GIF_BACKGROUND", u"255", "255"},
        {u"PDF_TITLE", u" a b ", " a b "},
        {u"ZMN_DESCRIPTION", u"\u20AC", "\u20AC"},
        {u"EXIF_WHITEPOINT1", u"0.25", "0.25"},
        {u"ISNATIVEPIXELFORMAT", u"true", "true"},
        {u"NATIVEPIXELFORMAT", u"true", ""},
        {u"NO_SUCH_KEY", u"1", ""},
        {u"TIFF_PHOTOMETINTEPRET", u"5", "5"},
    };
    for (const TRow& row : rows) {
        EXPECT_EQ(row.expected, SetGet(row.key, row.value)) << Utf8FromUtf16(row.key);
    }
    EXPECT_EQ((TRGB{0, 0, 255}), params_.fGIF_Background);  // the low byte is red
    EXPECT_EQ(0.25, params_.fEXIF_WhitePoint[1]);
}

TEST_F(IOParamsProperties, TheSpellingWithTheSecondRIsNoKey) {
    params_.SetProperty(u"TIFF_PHOTOMETINTERPRET", u"1");
    EXPECT_EQ(ioTIFF_RGB, params_.fTIFF_PhotometInterpret);
    EXPECT_EQ("", Get(u"TIFF_PHOTOMETINTERPRET"));
}

TEST_F(IOParamsProperties, SettersReachWhatDependsOnTheField) {
    params_.fEXIF_XResolution = 1;
    params_.SetProperty(u"DPIX", u"none");
    EXPECT_EQ(1, params_.fEXIF_XResolution);
    params_.SetProperty(u"DPIX", u"96");
    EXPECT_EQ(96, params_.fEXIF_XResolution);
    params_.SetProperty(u"ImageIndex", u"4");
    EXPECT_EQ(4, params_.fGIF_ImageIndex);
    params_.SetProperty(u"XMP_INFO", u"<a b=\"c\"/>");
    EXPECT_EQ(u"c", params_.fDict.GetString(u"b", /*recursive=*/true));
    params_.SetProperty(u"XMP_INFO", u"<broken");
    EXPECT_EQ("<broken", params_.fXMP_Info);
    EXPECT_FALSE(params_.fDict.HasKey(u"XMP"));
}

TEST_F(IOParamsProperties, ComputedAndReadOnlyValues) {
    params_.fEXIF_GPSLatitudeDegrees = 41;
    params_.fEXIF_GPSLatitudeMinutes = 30;
    params_.fEXIF_GPSLatitudeSeconds = 9;
    params_.fEXIF_GPSLatitudeRef = "S";
    EXPECT_EQ("-41.5025", Get(u"EXIF_GPSLATITUDE"));
    EXPECT_EQ("0.0", Get(u"EXIF_GPSLONGITUDE"));
    params_.fColorMap = {TRGB{0, 0, 1}, TRGB{1, 0, 0}};
    params_.fColorMapCount = 2;
    EXPECT_EQ("1", Get(u"COLORMAPITEM"));
    EXPECT_EQ("65536", Get(u"COLORMAPITEM1"));
    EXPECT_EQ("", Get(u"COLORMAPITEM2"));
    EXPECT_EQ("2", SetGet(u"COLORMAPCOUNT", u"9"));
    EXPECT_EQ("false", SetGet(u"ABORTING", u"true"));
    params_.fOriginalWidth = 12;
    EXPECT_EQ("12", SetGet(u"JPEG_ORIGINALWIDTH", u"3"));
    params_.fWIC_CodecInfo.author = u"me";
    EXPECT_EQ("me", SetGet(u"WIC_CODECINFOAUTHOR", u"you"));
}

const char* StoredText(std::int32_t since) {
    static std::string text;
    text = since == kNotStored ? "" : since == 0 ? "always" : std::to_string(since);
    return text.c_str();
}

std::string TypeText(const TZmFieldType& type) {
    return type.last_ordinal < 0 ? type.name
                                 : type.name + (" 0 to " + std::to_string(type.last_ordinal));
}

/// docs/io-parameters.md from the table of fields.
std::string Documentation() {
    std::string keys;
    std::string others;
    for (const auto rows : {TZmIOFieldTable::Stored(), TZmIOFieldTable::NotStored()}) {
        for (const TZmIOField& field : rows) {
            const std::string tail = std::string(field.name) + " | " + TypeText(*field.type) +
                                     " | " + StoredText(field.since) + " |\n";
            if (field.use == kNoKey) {
                others += "| " + tail;
            } else {
                keys += "| `" + KeyOfField(field) + "` | " +
                        (field.use == kReadKey ? "read" : "read, write") + " | " + tail;
            }
        }
    }
    return "# File parameters\n\n"
           "Made from the table of fields by `io_test`; with `ZM_UPDATE_DOCS=1` in the\n"
           "environment the test writes this file anew instead of comparing it.\n\n"
           "## Keys of GetProperty and SetProperty\n\n"
           "Keys are compared without case. Numbers, ordinals and colours (low byte red) are\n"
           "decimal, doubles with a point; Booleans are `true` and `false`. A text that is no\n"
           "value of the field changes nothing. `COLORMAPITEM` takes the number of an entry\n"
           "behind it. The last column is the first version of the stream form with the field.\n\n"
           "| Key | Use | Field | Type | Stream |\n|---|---|---|---|---|\n" +
           keys +
           "\n## Fields of the stream form without a key\n\n"
           "| Field | Type | Stream |\n|---|---|---|\n" +
           others;
}

TEST_F(IOParamsProperties, TheDocumentationIsTheTable) {
    const auto path = test::PathFromUtf8(ZM_SOURCE_DIR) / "docs" / "io-parameters.md";
    const std::string expected = Documentation();
    if (std::getenv("ZM_UPDATE_DOCS") != nullptr) {
        test::WriteFileBytes(path, {expected.begin(), expected.end()});
        return;
    }
    if (!std::filesystem::exists(path)) {
        GTEST_SKIP() << "the sources are not here";
    }
    const std::vector<std::uint8_t> bytes = test::ReadFileBytes(path);
    EXPECT_EQ(expected, std::string(bytes.begin(), bytes.end()))
        << "run this test with ZM_UPDATE_DOCS=1";
}

}  // namespace
}  // namespace zm
