#include "engine/codecs/pngfilt.h"

#include <gtest/gtest.h>

#include <algorithm>

#include "engine/io/zmioparams.h"
#include "tests/codecs/codecstreams.h"
#include "tests/codecs/pngbuilder.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

struct TLoaded {
    TZmBitmap bitmap;
    TIOParams params;
    TTestProgress progress;
};

void Load(TLoaded& loaded, const TBytes& bytes, bool params_only = false) {
    TBorrowedMemoryStream stream(bytes.data(), static_cast<std::int64_t>(bytes.size()));
    ReadPNGStream(stream, loaded.bitmap, loaded.params, params_only, loaded.progress.record);
}

std::uint8_t To8(std::uint32_t sample, int depth) {
    return static_cast<std::uint8_t>(depth == 16 ? sample >> 8
                                                 : sample * 255 / ((1u << depth) - 1));
}

/// The colour of a pixel by the standard's own words.
TRGB ExpectedColor(const TPngPicture& picture, std::uint32_t x, std::uint32_t y) {
    const auto sample = [&](int channel) { return picture.Sample(x, y, channel); };
    if (picture.color_type == 3) {
        return TRGB{picture.PaletteByte(sample(0), 2), picture.PaletteByte(sample(0), 1),
                    picture.PaletteByte(sample(0), 0)};
    }
    const bool is_gray = picture.Channels() < 3;
    return TRGB{To8(sample(is_gray ? 0 : 2), picture.depth),
                To8(sample(is_gray ? 0 : 1), picture.depth), To8(sample(0), picture.depth)};
}

void ExpectColors(const TPngPicture& picture, TZmBitmap& bitmap) {
    ASSERT_EQ(bitmap.GetWidth(), static_cast<std::int32_t>(picture.width));
    ASSERT_EQ(bitmap.GetHeight(), static_cast<std::int32_t>(picture.height));
    for (std::uint32_t y = 0; y < picture.height; ++y) {
        for (std::uint32_t x = 0; x < picture.width; ++x) {
            const TRGB color =
                bitmap.GetPixels(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y));
            ASSERT_EQ(color, ExpectedColor(picture, x, y)) << "x " << x << " y " << y;
        }
    }
}

void ExpectAlphaSamples(const TPngPicture& picture, TZmBitmap& bitmap) {
    ASSERT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_FALSE(bitmap.GetAlphaChannelRaw()->GetFull());
    for (std::uint32_t y = 0; y < picture.height; ++y) {
        for (std::uint32_t x = 0; x < picture.width; ++x) {
            const std::uint32_t sample = picture.Sample(x, y, picture.Channels() - 1);
            ASSERT_EQ(bitmap.GetAlpha(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y)),
                      To8(sample, picture.depth));
        }
    }
}

struct TKind {
    int color_type;
    int depth;
};

constexpr TKind kKinds[] = {{0, 1}, {0, 2}, {0, 4}, {0, 8}, {0, 16}, {2, 8}, {2, 16}, {3, 1},
                            {3, 2}, {3, 4}, {3, 8}, {4, 8}, {4, 16}, {6, 8}, {6, 16}};

/// Native mode keeps grey and palette pixels of whole bytes.
TZmPixelFormat ExpectedFormat(TKind kind, bool native) {
    const bool is_gray = kind.color_type == 0;
    if (is_gray && kind.depth == 1) {
        return zm1g;
    }
    if (!native || kind.depth < 8 || (!is_gray && kind.color_type != 3)) {
        return zm24RGB;
    }
    return !is_gray ? zm8p : kind.depth == 8 ? zm8g : zm16g;
}

void ExpectLoads(const TPngPicture& picture, bool native) {
    TLoaded loaded;
    loaded.params.fNativePixelFormat = native;
    Load(loaded, picture.Build());
    ASSERT_FALSE(loaded.progress.aborting);
    const TZmPixelFormat format = ExpectedFormat({picture.color_type, picture.depth}, native);
    ASSERT_EQ(loaded.bitmap.GetPixelFormat(), format);
    if (format == zm16g) {
        const auto x = static_cast<std::int32_t>(picture.width) - 1;
        EXPECT_EQ(loaded.bitmap.GetPixels_zm16g(x, 0), picture.Sample(picture.width - 1, 0, 0));
    } else {
        ExpectColors(picture, loaded.bitmap);
    }
    if (picture.color_type >= 4) {
        ExpectAlphaSamples(picture, loaded.bitmap);
    } else {
        EXPECT_FALSE(loaded.bitmap.HasAlphaChannel());
    }
    EXPECT_EQ(loaded.params.fBitsPerSample, picture.color_type == 3 ? 8 : picture.depth);
    EXPECT_EQ(loaded.params.fSamplesPerPixel, picture.Channels());
    EXPECT_EQ(loaded.params.fPNG_Interlaced, picture.interlaced);
    EXPECT_EQ(loaded.params.GetImageCount(), 1);
}

TEST(PngReader, EveryColorTypeDepthAndInterlacing) {
    constexpr std::uint32_t kSizes[][2] = {{1, 1}, {9, 7}, {8, 17}};
    for (const TKind kind : kKinds) {
        for (const auto& size : kSizes) {
            for (const int mode : {0, 1, 2, 3}) {
                SCOPED_TRACE(testing::Message()
                             << "type " << kind.color_type << " depth " << kind.depth << " mode "
                             << mode << " width " << size[0]);
                ExpectLoads({size[0], size[1], kind.depth, kind.color_type, mode > 1, {}, {}},
                            mode % 2 != 0);
            }
        }
    }
}

TEST(PngReader, TransparencyChunkBecomesAlpha) {
    const auto low = [](std::uint32_t value) { return static_cast<std::uint8_t>(value); };
    for (const TKind kind : {TKind{0, 2}, TKind{0, 8}, TKind{0, 16}, TKind{2, 8}, TKind{3, 1},
                             TKind{3, 2}, TKind{3, 8}}) {
        SCOPED_TRACE(testing::Message() << "type " << kind.color_type << " depth " << kind.depth);
        TPngPicture picture{5, 3, kind.depth, kind.color_type, false, {}, {}};
        TBytes chunk;
        if (kind.color_type == 3) {
            chunk.assign(picture.Sample(0, 0, 0) + 1, 200);
            chunk.back() = 17;
        } else {
            for (int channel = 0; channel < picture.Channels(); ++channel) {
                const std::uint32_t sample = picture.Sample(0, 0, channel);
                chunk.push_back(low(sample >> 8));
                chunk.push_back(low(sample));
            }
        }
        picture.before_data = PngChunk("tRNS", chunk);
        TLoaded loaded;
        Load(loaded, picture.Build());
        ASSERT_FALSE(loaded.progress.aborting);
        EXPECT_EQ(loaded.bitmap.GetPixelFormat(), zm24RGB);
        ASSERT_TRUE(loaded.bitmap.HasAlphaChannel());
        EXPECT_EQ(loaded.bitmap.GetAlpha(0, 0), kind.color_type == 3 ? 17 : 0);
        ExpectColors(picture, loaded.bitmap);
    }
    TPngPicture bits{5, 3, 1, 0, false, PngChunk("tRNS", {0, 1}), {}};
    TLoaded loaded;
    Load(loaded, bits.Build());
    EXPECT_EQ(loaded.bitmap.GetPixelFormat(), zm1g);
    EXPECT_FALSE(loaded.bitmap.HasAlphaChannel());
}

TBytes PhysChunk(std::uint32_t x, std::uint32_t y, std::uint8_t unit) {
    TBytes data;
    PutU32BE(data, x);
    PutU32BE(data, y);
    data.push_back(unit);
    return PngChunk("pHYs", data);
}

TEST(PngReader, ResolutionIsRoundedAndFallsBackToTheSettings) {
    struct {
        TBytes chunk;
        std::int32_t dpi_x;
        std::int32_t dpi_y;
    } const cases[] = {
        {PhysChunk(2835, 11811, 1), 72, 300},
        {PhysChunk(3937, 3780, 1), 100, 96},
        {PhysChunk(19, 20, 1), 300, 1},        // 0.4826 and 0.508
        {PhysChunk(4000, 4000, 0), 300, 300},  // an aspect ratio only
        {{}, 300, 300},
    };
    for (const auto& one : cases) {
        TLoaded loaded;
        loaded.params.SetDpiX(7);
        loaded.params.SetDpiY(7);
        Load(loaded, TPngPicture{1, 1, 8, 2, false, one.chunk, {}}.Build(), /*params_only=*/true);
        EXPECT_EQ(loaded.params.GetDpiX(), one.dpi_x);
        EXPECT_EQ(loaded.params.GetDpiY(), one.dpi_y);
    }
}

TEST(PngReader, TextsComeInOrderFromBothSidesOfTheImage) {
    TBytes packed = BytesOf(std::string("Packed\0\0", 8));
    const TBytes deflated = Deflate(BytesOf("small"));
    packed.insert(packed.end(), deflated.begin(), deflated.end());
    TPngPicture picture{2, 2, 8, 2, false, PngText("Title", "one"), PngText("Last", "three")};
    const TBytes middle = PngChunk("zTXt", packed);
    const TBytes wide = PngChunk("iTXt", BytesOf(std::string("Wide\0\0\0en\0W\0\xC3\xA4", 14)));
    picture.before_data.insert(picture.before_data.end(), middle.begin(), middle.end());
    picture.before_data.insert(picture.before_data.end(), wide.begin(), wide.end());
    TLoaded loaded;
    loaded.params.fPNG_TextKeys = {"stale"};
    loaded.params.fPNG_TextValues = {"stale"};
    Load(loaded, picture.Build());
    EXPECT_FALSE(loaded.progress.aborting);
    EXPECT_EQ(loaded.params.fPNG_TextKeys, (TStringList{"Title", "Packed", "Wide", "Last"}));
    EXPECT_EQ(loaded.params.fPNG_TextValues, (TStringList{"one", "small", "\xC3\xA4", "three"}));
}

/// A profile that the library takes: a head of 128 bytes and an empty table of tags, with bytes
/// behind them that do not compress, since it refuses very small chunks.
TBytes SmallProfile() {
    TBytes profile(252);
    profile[3] = 252;
    for (std::uint32_t i = 132; i < 252; ++i) {
        profile[i] = static_cast<std::uint8_t>(i * 2654435761u >> 24);
    }
    const auto put = [&profile](std::size_t at, const std::string& text) {
        std::copy(text.begin(), text.end(), profile.begin() + static_cast<std::ptrdiff_t>(at));
    };
    profile[8] = 2;
    put(12, "mntrRGB XYZ ");
    put(36, "acsp");
    profile[70] = 0xF6;  // the white of the connection space
    profile[71] = 0xD6;
    profile[73] = 1;
    profile[78] = 0xD3;
    profile[79] = 0x2D;
    return profile;
}

TEST(PngReader, MetadataChunksAreKeptFromBothSidesOfTheImage) {
    const TBytes exif = {'I', 'I', 42, 0, 8, 0, 0, 0, 0, 0, 0, 0, 0, 0};
    TBytes packed = BytesOf(std::string("Mine\0\0", 6));
    const TBytes deflated = Deflate(SmallProfile());
    packed.insert(packed.end(), deflated.begin(), deflated.end());
    TPngPicture picture{2, 2, 8, 2, false, PngChunk("iCCP", packed), PngChunk("eXIf", exif)};
    const TBytes wide = PngChunk("iTXt", BytesOf(std::string("Wide\0\0\0en\0W\0\xC3\xA4", 14)));
    TBytes packet = BytesOf(std::string("XML:com.adobe.xmp\0\1\0\0\0", 22));
    const TBytes deflated_packet = Deflate(BytesOf("<x:xmpmeta/>"));
    packet.insert(packet.end(), deflated_packet.begin(), deflated_packet.end());
    picture.before_data.insert(picture.before_data.end(), wide.begin(), wide.end());
    const TBytes xmp = PngChunk("iTXt", packet);
    picture.after_data.insert(picture.after_data.end(), xmp.begin(), xmp.end());
    TLoaded loaded;
    loaded.params.fPNG_Chunks.Add({kPngChunkExif, "stale", "", "", {1}});
    Load(loaded, picture.Build());
    ASSERT_FALSE(loaded.progress.aborting);
    TZmPngChunkList& chunks = loaded.params.fPNG_Chunks;
    ASSERT_EQ(chunks.Count(), 4);
    EXPECT_EQ(*chunks.Find(kPngChunkExif), (TZmPngChunk{kPngChunkExif, "", "", "", exif}));
    EXPECT_EQ(*chunks.Find(kPngChunkProfile),
              (TZmPngChunk{kPngChunkProfile, "Mine", "", "", SmallProfile()}));
    EXPECT_EQ(*chunks.Find(kPngChunkText),
              (TZmPngChunk{kPngChunkText, "Wide", "en", "W", BytesOf("\xC3\xA4")}));
    ASSERT_NE(chunks.FindXmp(), nullptr);
    EXPECT_EQ(chunks.FindXmp()->data, BytesOf("<x:xmpmeta/>"));

    TIOParams copy;
    copy.Assign(loaded.params);
    copy.fPNG_Chunks.Delete(kPngChunkExif);
    EXPECT_EQ(copy.fPNG_Chunks.Find(kPngChunkExif), nullptr);
    EXPECT_EQ(copy.fPNG_Chunks.Count(), 3);
    copy.fPNG_Chunks.DeleteXmp();
    EXPECT_EQ(copy.fPNG_Chunks.FindXmp(), nullptr);
    copy.fPNG_Chunks.Delete(kPngChunkProfile);
    EXPECT_EQ(copy.fPNG_Chunks.Find(kPngChunkProfile), nullptr);
    ASSERT_EQ(copy.fPNG_Chunks.Count(), 1);
    copy.fPNG_Chunks.DeletePlainTexts();
    EXPECT_EQ(copy.fPNG_Chunks.Count(), 0);
    EXPECT_EQ(chunks.Count(), 4);

    loaded.params.fGetMetaData = false;
    Load(loaded, picture.Build());
    EXPECT_EQ(chunks.Count(), 0);
    EXPECT_EQ(loaded.params.fPNG_TextKeys, (TStringList{"Wide", "XML:com.adobe.xmp"}));
}

TEST(PngReader, BackgroundByColorType) {
    struct {
        int color_type;
        int depth;
        TBytes data;
        TRGB expected;  // blue, green, red
    } const cases[] = {
        {2, 8, {0, 10, 0, 20, 0, 30}, {30, 20, 10}},
        {2, 16, {10, 99, 20, 99, 30, 99}, {30, 20, 10}},
        {0, 4, {0, 5}, {85, 85, 85}},
        {0, 1, {0, 1}, {255, 255, 255}},
        {3, 2, {2}, {220, 139, 58}},  // entry 2 of the palette: 58, 139, 220
    };
    for (const auto& one : cases) {
        const TPngPicture picture{
            1, 1, one.depth, one.color_type, false, PngChunk("bKGD", one.data), {}};
        TLoaded loaded;
        Load(loaded, picture.Build(), /*params_only=*/true);
        EXPECT_EQ(loaded.params.fPNG_Background, one.expected) << one.color_type;
    }
    TLoaded loaded;
    loaded.params.fPNG_Background = TRGB{1, 2, 3};
    Load(loaded, TPngPicture{}.Build());
    EXPECT_EQ(loaded.params.fPNG_Background, (TRGB{1, 2, 3}));
}

TEST(PngReader, ColorMapOfPaletteFilesAndParamsOnly) {
    const TPngPicture picture{6, 5, 4, 3, false, {}, {}};
    TLoaded loaded;
    Load(loaded, picture.Build(), /*params_only=*/true);
    EXPECT_FALSE(loaded.progress.aborting);
    EXPECT_TRUE(loaded.bitmap.IsEmpty());
    EXPECT_EQ(loaded.params.fWidth, 6);
    EXPECT_EQ(loaded.params.fOriginalHeight, 5);
    ASSERT_EQ(loaded.params.fColorMapCount, 16);
    EXPECT_EQ(loaded.params.fColorMap[15], (TRGB{85, 4, 179}));  // 15*29 + 162, +81, +0 mod 256
}

TEST(PngReader, TruncationAtEveryByte) {
    for (const bool interlaced : {false, true}) {
        const TPngPicture picture{5, 4, 8, 6, interlaced, PngText("Key", "value"), {}};
        const TBytes file = picture.Build();
        const std::size_t data_end = file.size() - 12;  // the end chunk has 12 bytes
        for (std::size_t length = 0; length < file.size(); ++length) {
            TLoaded loaded;
            Load(loaded, FirstBytes(file, length));
            // The four bytes of the checksum behind the image data may miss, and all of the end.
            if (length + 4 < data_end) {
                ASSERT_TRUE(loaded.progress.aborting) << length;
            } else {
                ASSERT_FALSE(loaded.progress.aborting) << length;
                EXPECT_EQ(loaded.progress.percents.back(), 100);
                ExpectAlphaSamples(picture, loaded.bitmap);
                ExpectColors(picture, loaded.bitmap);
            }
        }
    }
}

TEST(PngReader, DamagedChecksums) {
    const TPngPicture picture{5, 4, 8, 2, false, PngText("Key", "value"), {}};
    const TBytes file = picture.Build();
    const auto damaged_at = [&file](const char* chunk) {
        TBytes copy = file;
        const std::string name = chunk;
        const auto at = std::search(copy.begin(), copy.end(), name.begin(), name.end());
        const auto length_at = at - copy.begin() - 1;  // low byte of a short length
        const auto crc = length_at + 5 + copy[static_cast<std::size_t>(length_at)];
        copy[static_cast<std::size_t>(crc)] ^= 0x55;
        return copy;
    };
    for (const char* chunk : {"IHDR", "IDAT"}) {
        TLoaded loaded;
        Load(loaded, damaged_at(chunk));
        EXPECT_TRUE(loaded.progress.aborting) << chunk;
    }
    TLoaded loaded;
    Load(loaded, damaged_at("tEXt"));
    EXPECT_FALSE(loaded.progress.aborting);
    EXPECT_TRUE(loaded.params.fPNG_TextKeys.empty());
}

TEST(PngReader, HostileSizesAreRefusedBeforeAllocation) {
    const std::uint32_t sizes[][2] = {{0, 1},          {1, 0},          {0x7FFFFFFF, 0x7FFFFFFF},
                                      {0x80000000, 1}, {1, 0x80000000}, {0xFFFFFFFF, 1},
                                      {60000, 60000},  {0x0AAAAAAA, 1}, {1, 0x7FFFFFFF}};
    for (const auto& size : sizes) {
        for (const int color_type : {0, 2, 6}) {
            TPngPicture picture{1, 1, 16, color_type, false, {}, {}};
            TBytes file = picture.Build();
            TBytes sides;
            PutU32BE(sides, size[0]);
            PutU32BE(sides, size[1]);
            std::copy(sides.begin(), sides.end(), file.begin() + 16);
            TBytes crc;
            PutU32BE(crc, static_cast<std::uint32_t>(crc32(0, file.data() + 12, 17)));
            std::copy(crc.begin(), crc.end(), file.begin() + 29);
            TLoaded loaded;
            Load(loaded, file);
            EXPECT_TRUE(loaded.progress.aborting);
            EXPECT_TRUE(loaded.bitmap.IsEmpty()) << size[0] << " " << size[1];
        }
    }
}

TEST(PngReader, HugeCompressedTextsAreLeftOut) {
    TBytes data = BytesOf(std::string("Comment\0\0", 9));
    const TBytes deflated = Deflate(TBytes(28 << 20, 'x'));
    data.insert(data.end(), deflated.begin(), deflated.end());
    const TBytes chunk = PngChunk("zTXt", data);
    TPngPicture picture{3, 3, 8, 2, false, {}, {}};
    for (int i = 0; i < 5; ++i) {
        picture.before_data.insert(picture.before_data.end(), chunk.begin(), chunk.end());
    }
    TLoaded loaded;
    Load(loaded, picture.Build());
    EXPECT_FALSE(loaded.progress.aborting);
    EXPECT_LE(loaded.params.fPNG_TextKeys.size(), 2u);  // 64 MiB hold no third of 28 MiB
    ExpectColors(picture, loaded.bitmap);
}

TEST(PngReader, StreamStandsBehindTheImageAndASecondLoadIsEqual) {
    const TPngPicture picture{7, 5, 8, 6, true, {}, {}};
    TBytes two = picture.Build();
    const std::size_t one_size = two.size();
    two.insert(two.end(), two.begin(), two.begin() + static_cast<std::ptrdiff_t>(one_size));
    TBorrowedMemoryStream stream(two.data(), static_cast<std::int64_t>(two.size()));
    TLoaded first;
    TLoaded second;
    ReadPNGStream(stream, first.bitmap, first.params, false, first.progress.record);
    EXPECT_EQ(stream.GetPosition(), static_cast<std::int64_t>(one_size));
    ReadPNGStream(stream, second.bitmap, second.params, false, second.progress.record);
    EXPECT_FALSE(second.progress.aborting);
    ExpectSamePixels(first.bitmap, second.bitmap);
    ExpectSameAlpha(first.bitmap, second.bitmap);
    TLoaded again;
    Load(again, picture.Build());
    const auto opaque = TPngPicture{7, 10, 8, 2, false, {}, {}}.Build();
    again.progress.percents.clear();
    Load(again, opaque);
    EXPECT_FALSE(again.bitmap.HasAlphaChannel());  // the old plane is gone
    EXPECT_EQ(again.progress.percents,
              (std::vector<std::int32_t>{10, 20, 30, 40, 50, 60, 70, 80, 90, 100}));
}

}  // namespace
}  // namespace zm::test
