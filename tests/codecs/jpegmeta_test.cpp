#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <string>

#include "engine/codecs/jpegfilt_p.h"
#include "engine/codecs/orientation.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/metadata/zmexiforientation.h"
#include "engine/metadata/zmmetahooks.h"
#include "tests/codecs/jpegload.h"
#include "tests/support/testimages.h"

// What the JPEG codec does with EXIF, IPTC, XMP and profile markers, and turning upright.
namespace zm::test {
namespace {

using TBytes = std::vector<std::uint8_t>;

TBytes BytesOfText(const std::string& text) {
    return {text.begin(), text.end()};
}

/// A directory of two entries, the second the orientation.
TBytes ExifBlock(bool big_endian, std::uint8_t orientation) {
    if (big_endian) {
        return {'M', 'M',  0, 42, 0, 0, 0, 8, 0,   2,                    // directory at 8
                1,   0x0F, 0, 2,  0, 0, 0, 4, 'a', 'b',         'c', 0,  // maker
                1,   0x12, 0, 3,  0, 0, 0, 1, 0,   orientation, 0,   0,  // orientation, short
                0,   0,    0, 0};
    }
    return {'I', 'I', 42, 0,    8, 0, 0, 0, 2, 0, 0x0F, 1,           2, 0, 4, 0, 0, 0, 'a',
            'b', 'c', 0,  0x12, 1, 3, 0, 1, 0, 0, 0,    orientation, 0, 0, 0, 0, 0, 0, 0};
}

TBytes ExifMarker(std::uint8_t orientation) {
    TBytes marker = BytesOfText(std::string("Exif\0\0", 6));
    const TBytes block = ExifBlock(true, orientation);
    marker.insert(marker.end(), block.begin(), block.end());
    return marker;
}

TBytes ProfilePiece(std::uint8_t number, std::uint8_t count, const std::string& text) {
    TBytes piece = BytesOfText(std::string("ICC_PROFILE\0", 12));
    piece.push_back(number);
    piece.push_back(count);
    piece.insert(piece.end(), text.begin(), text.end());
    return piece;
}

/// Resource blocks with an IPTC block of the title "T".
TBytes TitleResource() {
    TBytes resource =
        BytesOfText(std::string("Photoshop 3.0\0"
                                "8BIM\4\4\0\0\0\0\0\6",
                                26));
    resource.insert(resource.end(), {0x1C, 2, 5, 0, 1, 'T'});
    return resource;
}

TBytes XmpMarker(const std::string& packet) {
    return BytesOfText(std::string("http://ns.adobe.com/xap/1.0/\0", 29) + packet);
}

using TMarkers = std::vector<std::pair<int, TBytes>>;

TBytes FileWith(const TMarkers& markers, int width = 19, int height = 13) {
    TRawSettings settings;
    settings.width = width;
    settings.height = height;
    settings.write_markers = [&markers](jpeg_compress_struct& encoder) {
        for (const auto& [type, data] : markers) {
            jpeg_write_marker(&encoder, type, data.data(), static_cast<unsigned>(data.size()));
        }
    };
    return EncodeRawJpeg(settings);
}

TEST(ExifOrientation, BothByteOrdersAndDamage) {
    for (const bool big_endian : {false, true}) {
        for (std::uint8_t value = 0; value < 10; ++value) {
            EXPECT_EQ(ReadExifOrientation(ExifBlock(big_endian, value)),
                      value >= 1 && value <= 8 ? value : 0);
        }
        TBytes block = ExifBlock(big_endian, 6);
        ASSERT_TRUE(SetExifOrientation(block, 1));
        EXPECT_EQ(block, ExifBlock(big_endian, 1));
        const TBytes whole = ExifBlock(big_endian, 6);
        for (std::size_t length = 0; length < 34; ++length) {
            TBytes cut = FirstBytes(whole, length);
            EXPECT_EQ(ReadExifOrientation(cut), 0) << length;
            EXPECT_FALSE(SetExifOrientation(cut, 1));
        }
    }
    TBytes far = ExifBlock(true, 6);
    far[4] = 0xFF;  // directory outside the block
    EXPECT_EQ(ReadExifOrientation(far), 0);
    TBytes many = ExifBlock(true, 6);
    many[8] = many[9] = 0xFF;
    EXPECT_EQ(ReadExifOrientation(many), 6);
    TBytes wrong_type = ExifBlock(true, 6);
    wrong_type[25] = 2;
    EXPECT_EQ(ReadExifOrientation(wrong_type), 0);
}

/// Letters by row as they lie in the file, and upright.
TEST(TurnUpright, ByHand) {
    const char* const expected[8] = {"abc/def",  "cba/fed",  "fed/cba",  "def/abc",
                                     "ad/be/cf", "da/eb/fc", "fc/eb/da", "cf/be/ad"};
    for (std::int32_t orientation = 1; orientation <= 8; ++orientation) {
        TZmBitmap bitmap(3, 2, zm8g);
        for (std::int32_t i = 0; i < 6; ++i) {
            bitmap.SetPixels_zm8(i % 3, i / 3, static_cast<std::uint8_t>('a' + i));
        }
        ASSERT_TRUE(TurnUpright(bitmap, orientation));
        std::string text;
        for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
            text += y > 0 ? "/" : "";
            for (std::int32_t x = 0; x < bitmap.GetWidth(); ++x) {
                text += static_cast<char>(bitmap.GetPixels_zm8(x, y));
            }
        }
        EXPECT_EQ(text, expected[orientation - 1]) << orientation;
    }
}

TEST(TurnUpright, TheWayBackGivesTheSameForAllPixelSizesAndStrips) {
    constexpr std::int32_t kBack[] = {1, 2, 3, 4, 5, 8, 7, 6};
    for (const TZmPixelFormat format : {zm8g, zm24RGB, zmCMYK}) {
        for (const std::int32_t height : {1, 31, 32, 33, 70}) {
            for (std::int32_t orientation = 0; orientation <= 9; ++orientation) {
                const auto before = MakeNoise(format, 37, height, 4);
                const auto bitmap = MakeNoise(format, 37, height, 4);
                ASSERT_TRUE(TurnUpright(*bitmap, orientation));
                const bool is_known = orientation >= 1 && orientation <= 8;
                EXPECT_EQ(bitmap->GetWidth(), is_known && orientation > 4 ? height : 37);
                ASSERT_TRUE(TurnUpright(*bitmap, is_known ? kBack[orientation - 1] : 1));
                ExpectSamePixels(*before, *bitmap);
            }
        }
    }
}

TEST(JpegOrientation, IsAppliedOnlyWhenEnabledAndTheMarkerFollows) {
    const TBytes file = FileWith({{0xE1, BytesOfText("other")}, {0xE1, ExifMarker(6)}}, 20, 10);
    TLoadedJpeg lying;
    Load(lying, file);
    EXPECT_EQ(lying.bitmap.GetWidth(), 20);
    EXPECT_EQ(lying.params.fEXIF_Orientation, 6);
    EXPECT_EQ(lying.params.fTIFF_Orientation, 6);
    EXPECT_FALSE(lying.params.fEXIF_HasEXIFData);  // no reader of blocks is installed

    TLoadedJpeg upright;
    upright.params.fJPEG_EnableAdjustOrientation = true;
    Load(upright, file);
    EXPECT_FALSE(upright.progress.aborting);
    ASSERT_TRUE(TurnUpright(lying.bitmap, 6));
    ExpectSamePixels(lying.bitmap, upright.bitmap);
    EXPECT_EQ(upright.params.fWidth, 10);
    EXPECT_EQ(upright.params.fHeight, 20);
    EXPECT_EQ(upright.params.fOriginalWidth, 20);
    EXPECT_EQ(upright.params.fEXIF_Orientation, 1);
    EXPECT_EQ(upright.params.fTIFF_Orientation, 1);
    ASSERT_EQ(upright.params.fJPEG_MarkerList.Count(), 2);
    const auto marker = upright.params.fJPEG_MarkerList.GetMarkerData(1);
    EXPECT_EQ(TBytes(marker.begin(), marker.end()), ExifMarker(1));

    TLoadedJpeg header;
    header.params.fJPEG_EnableAdjustOrientation = true;
    header.options.params_only = true;
    Load(header, file);
    EXPECT_EQ(header.params.fEXIF_Orientation, 6);
    EXPECT_EQ(header.params.fWidth, 20);
}

TEST(JpegMetadata, IptcAndXmpAreReadAndNotWhenUnwanted) {
    const TBytes file = FileWith(
        {{0xED, {0x1C, 2, 5, 0, 1, 'X'}}, {0xED, TitleResource()}, {0xE1, XmpMarker("<x/>")}});
    TLoadedJpeg loaded;
    Load(loaded, file);
    EXPECT_EQ(loaded.params.ReadIPTCField(2, 5), "T");
    EXPECT_EQ(loaded.params.fXMP_Info, "<x/>");
    for (const bool by_option : {true, false}) {
        TLoadedJpeg without;
        without.options.read_metadata = !by_option;
        without.params.fGetMetaData = by_option;
        Load(without, file);
        EXPECT_EQ(without.params.fIPTC_Info.Count(), 0);
        EXPECT_TRUE(without.params.fXMP_Info.empty());
        EXPECT_EQ(without.params.fJPEG_MarkerList.Count(), 3);
    }
}

TBytes Exchanged(const TBytes& file, TJpegBlock block, const TBytes& data) {
    TMemoryStream input(file);
    TMemoryStream output;
    EXPECT_TRUE(ExchangeJpegBlock(input, output, block, data));
    return output.Bytes();
}

TEST(JpegExchange, ABlockTakesThePlaceOfTheOldOnesAndAllElseStays) {
    const TBytes old_iptc = BytesOfText("Photoshop 3.0 old");
    const TBytes new_iptc = BytesOfText("Photoshop 3.0 new");
    const TBytes other = BytesOfText("Adobe_CM");
    const TBytes comment = BytesOfText("comment");
    const TBytes xmp = XmpMarker("<x/>");
    const TBytes file =
        FileWith({{0xFE, comment}, {0xED, old_iptc}, {0xED, other}, {0xE1, xmp}, {0xED, old_iptc}});
    const TBytes without = FileWith({{0xFE, comment}, {0xED, other}, {0xE1, xmp}});
    const TBytes with = FileWith({{0xED, new_iptc}, {0xFE, comment}, {0xED, other}, {0xE1, xmp}});
    EXPECT_EQ(Exchanged(file, kJpegBlockIptc, new_iptc), with);
    EXPECT_EQ(Exchanged(without, kJpegBlockIptc, new_iptc), with);
    EXPECT_EQ(Exchanged(file, kJpegBlockIptc, {}), without);

    const TBytes exif = ExifMarker(6);
    const TBytes with_exif = FileWith({{0xE1, exif}, {0xFE, comment}, {0xED, other}, {0xE1, xmp}});
    EXPECT_EQ(Exchanged(without, kJpegBlockExif, exif), with_exif);
    TBytes junk_in_front{1, 2, 3};
    junk_in_front.insert(junk_in_front.end(), with_exif.begin(), with_exif.end());
    EXPECT_EQ(Exchanged(junk_in_front, kJpegBlockExif, {}), without);
}

TEST(JpegExchange, WhatIsCutOrFullFails) {
    const TBytes file = FileWith({{0xFE, BytesOfText("comment")}});
    const TBytes iptc = BytesOfText("Photoshop 3.0");
    for (std::size_t length = 0; length < FindMarker(file, 0xDA); ++length) {
        TMemoryStream input(FirstBytes(file, length));
        TMemoryStream output;
        ASSERT_FALSE(ExchangeJpegBlock(input, output, kJpegBlockIptc, iptc)) << length;
        TMemoryStream whole(file);
        TFullStream full(static_cast<std::int64_t>(length), /*raises=*/false);
        ASSERT_FALSE(ExchangeJpegBlock(whole, full, kJpegBlockIptc, iptc)) << length;
    }
    TBytes short_length = file;
    short_length[4] = short_length[5] = 0;  // of the first segment
    TMemoryStream output;
    TMemoryStream damaged(short_length);
    EXPECT_FALSE(ExchangeJpegBlock(damaged, output, kJpegBlockIptc, iptc));
    TMemoryStream input(file);
    EXPECT_FALSE(ExchangeJpegBlock(input, output, kJpegBlockIptc, TBytes(65534)));
    EXPECT_EQ(Exchanged(file, kJpegBlockIptc, TBytes(65533)).size(), file.size() + 65537);
}

TEST(JpegProfile, PiecesAreJoinedByNumberAndCutAgain) {
    const auto join = [](const std::vector<TBytes>& pieces) {
        TZmMarkerList markers;
        markers.AddMarker(kMarkerApp2, BytesOfText("MPF"));
        for (const TBytes& piece : pieces) {
            markers.AddMarker(kMarkerApp2, piece);
        }
        const TBytes profile = JoinJpegProfile(markers);
        return std::string(profile.begin(), profile.end());
    };
    EXPECT_EQ(join({ProfilePiece(1, 1, "one")}), "one");
    EXPECT_EQ(join({ProfilePiece(2, 2, "two"), ProfilePiece(1, 2, "one")}), "onetwo");
    EXPECT_EQ(join({}), "");
    EXPECT_EQ(join({ProfilePiece(1, 2, "one")}), "");                         // lacks one
    EXPECT_EQ(join({ProfilePiece(1, 2, "a"), ProfilePiece(1, 2, "b")}), "");  // twice
    EXPECT_EQ(join({ProfilePiece(1, 2, "a"), ProfilePiece(2, 3, "b")}), "");  // disagree
    EXPECT_EQ(join({ProfilePiece(0, 1, "a")}), "");
    EXPECT_EQ(join({ProfilePiece(255, 1, "a")}), "");

    for (const std::size_t size : {1u, 65519u, 65520u, 200000u}) {
        TBytes profile(size);
        for (std::size_t i = 0; i < size; ++i) {
            profile[i] = static_cast<std::uint8_t>(i * 7);
        }
        TZmMarkerList markers;
        CutJpegProfile(profile, markers);
        EXPECT_EQ(markers.Count(), static_cast<std::int32_t>((size + 65518) / 65519));
        EXPECT_LE(markers.GetMarkerLength(0), 65533);
        EXPECT_EQ(JoinJpegProfile(markers), profile);
    }
    TZmMarkerList none;
    CutJpegProfile(TBytes(65519u * 255 + 1), none);
    EXPECT_EQ(none.Count(), 0);
}

/// Hooks that write down what they are called with; the former ones come back.
class TRecordingHooks {
public:
    TRecordingHooks() : former_(MetadataHooks()), former_cms_(ZmGlobalSettings().fEnableCMS) {
        calls.clear();
        MetadataHooks() = {ReadExif, ReadProfile, MakeProfile, OpenRows, OutputProfile};
    }
    ~TRecordingHooks() {
        MetadataHooks() = former_;
        ZmGlobalSettings().fEnableCMS = former_cms_;
    }
    TRecordingHooks(const TRecordingHooks&) = delete;
    TRecordingHooks& operator=(const TRecordingHooks&) = delete;

    static inline std::vector<std::string> calls;

private:
    static bool ReadExif(TIOParams& params, std::span<const std::uint8_t> block) {
        calls.push_back("exif after " + params.ReadIPTCField(2, 5));
        params.fEXIF_HasEXIFData = true;
        params.fEXIF_XResolution = 72.9;
        params.fEXIF_YResolution = 96;
        params.fEXIF_InteropIndex = "R03";
        EXPECT_EQ(ReadExifOrientation(block), 1);
        return true;
    }
    static bool ReadProfile(TIOParams& params, std::span<const std::uint8_t> profile) {
        calls.push_back("profile " + std::string(profile.begin(), profile.end()) + " after " +
                        params.fXMP_Info);
        return profile[0] == 'o';
    }
    static bool MakeProfile(TIOParams& params) {
        calls.push_back("made for " + params.fEXIF_InteropIndex);
        return true;
    }
    static TZmProfileRow OpenRows(TIOParams&, TZmPixelFormat source, TZmPixelFormat) {
        calls.push_back("rows of " + std::to_string(source == zmCMYK ? 4 : 3));
        return [](const std::uint8_t* from, std::uint8_t* to, std::int32_t width) {
            to[0] = static_cast<std::uint8_t>(255 - from[0]);
            return width != 5;  // a profile that fails
        };
    }
    static TBytes OutputProfile(TIOParams&, std::int32_t file_type) {
        return file_type == ioJPEG ? BytesOfText("new profile") : TBytes{};
    }

    TZmMetadataHooks former_;
    bool former_cms_;
};

TMarkers AllMarkers(const std::string& profile) {
    return {{0xE2, ProfilePiece(1, 1, profile)},
            {0xE1, XmpMarker("<x/>")},
            {0xE1, ExifMarker(1)},
            {0xED, TitleResource()}};
}

TEST(JpegHooks, RunInTheStatedOrderWhateverTheMarkersOrder) {
    const TRecordingHooks hooks;
    TLoadedJpeg loaded;
    Load(loaded, FileWith(AllMarkers("own")));
    EXPECT_EQ(hooks.calls, (std::vector<std::string>{"exif after T", "profile own after <x/>"}));
    EXPECT_EQ(loaded.params.GetDpiX(), 72);  // the file's 1 by 1 is a placeholder
    EXPECT_EQ(loaded.params.GetDpiY(), 96);
    hooks.calls.clear();
    TLoadedJpeg made;
    Load(made, FileWith(AllMarkers("bad")));
    EXPECT_EQ(hooks.calls.back(), "made for R03");
    ZmGlobalSettings().fEXIFInteroperabilityIndexUsage = zmiiNone;
    hooks.calls.clear();
    Load(made, FileWith(AllMarkers("bad")));
    ZmGlobalSettings().fEXIFInteroperabilityIndexUsage = zmiiApplyAndReset;
    EXPECT_EQ(hooks.calls.back(), "profile bad after <x/>");
}

TEST(JpegHooks, AStatedResolutionStays) {
    const TRecordingHooks hooks;
    TRawSettings settings;
    settings.density_unit = 1;
    settings.x_density = 150;
    settings.write_markers = [](jpeg_compress_struct& encoder) {
        const TBytes marker = ExifMarker(1);
        jpeg_write_marker(&encoder, 0xE1, marker.data(), static_cast<unsigned>(marker.size()));
    };
    TLoadedJpeg loaded;
    Load(loaded, EncodeRawJpeg(settings));
    EXPECT_EQ(loaded.params.GetDpiX(), 150);
    EXPECT_EQ(loaded.params.GetDpiY(), 1);
}

TEST(JpegHooks, RowsGoThroughTheProfileWithColorManagement) {
    const TRecordingHooks hooks;
    const TBytes file = FileWith(AllMarkers("own"));
    TLoadedJpeg plain;
    Load(plain, file);
    ZmGlobalSettings().fEnableCMS = true;
    TLoadedJpeg managed;
    Load(managed, file);
    EXPECT_EQ(hooks.calls.back(), "rows of 3");
    EXPECT_EQ(managed.bitmap.GetScanLine(4)[0], 255 - plain.bitmap.GetScanLine(4)[0]);
    const TBytes narrow = FileWith(AllMarkers("own"), 5, 9);  // the profile fails: plain rows
    TLoadedJpeg failed;
    Load(failed, narrow);
    ZmGlobalSettings().fEnableCMS = false;
    TLoadedJpeg expected;
    Load(expected, narrow);
    ExpectSamePixels(expected.bitmap, failed.bitmap);
}

TEST(JpegHooks, TheOutputProfileReplacesTheOldOne) {
    const TRecordingHooks hooks;
    TLoadedJpeg loaded;
    Load(loaded, FileWith(AllMarkers("own")));
    TMemoryStream saved;
    WriteJPEGStream(saved, loaded.bitmap, loaded.params, loaded.progress.record);
    TLoadedJpeg again;
    again.options.params_only = true;
    Load(again, saved.Bytes());
    const TZmMarkerList& markers = again.params.fJPEG_MarkerList;
    ASSERT_EQ(markers.Count(), 4);
    EXPECT_EQ(markers.GetMarkerType(0), kMarkerApp2);
    EXPECT_EQ(JoinJpegProfile(markers), BytesOfText("new profile"));
}

TEST(JpegReader, YCbCrSamplesAreKeptWhenAsked) {
    const TBytes file = EncodeRawJpeg({});
    TLoadedJpeg loaded;
    loaded.options.keep_ycbcr = true;
    Load(loaded, file);
    TRawJpeg raw;
    DecodeRawJpeg(file, JCS_YCbCr, 1, raw);
    const std::uint8_t* row = loaded.bitmap.GetScanLine(3);
    EXPECT_EQ(TBytes(row, row + 57), TBytes(raw.pixels.begin() + 171, raw.pixels.begin() + 228));
    EXPECT_EQ(loaded.params.fJPEG_ColorSpace, ioJPEG_YCbCr);
}

}  // namespace
}  // namespace zm::test
