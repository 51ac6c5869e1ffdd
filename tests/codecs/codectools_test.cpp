#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "engine/bitmap/zmmask.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "tests/codecs/jpegraw.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"
#include "tests/support/testprocess.h"

// Programs from elsewhere as the other opinion: what they see in what we write, and how
// they turn photos. A test whose program is not installed says so.
namespace zm::test {
namespace {

using TBytes = std::vector<std::uint8_t>;

bool HasTool(const std::string& command, const TempFolder& folder) {
    return RunProcess(command, folder.Path()).exit_status == 0;
}

/// A picture in the simplest of formats (PPM or PGM of 8 bits).
struct TPlainPicture {
    std::int32_t width = 0;
    std::int32_t height = 0;
    std::int32_t channels = 0;
    const std::uint8_t* pixels = nullptr;
    TBytes bytes;

    const std::uint8_t* Pixel(std::int32_t x, std::int32_t y) const {
        return pixels + (static_cast<std::ptrdiff_t>(y) * width + x) * channels;
    }
};

void ReadPlainPicture(const std::filesystem::path& path, TPlainPicture& picture) {
    picture.bytes = ReadFileBytes(path);
    picture.bytes.push_back(0);
    const auto* text = reinterpret_cast<const char*>(picture.bytes.data());
    char kind = 0;
    int header = 0;
    const int found =
        std::sscanf(text, "P%c %d %d 255%n", &kind, &picture.width, &picture.height, &header);
    ASSERT_EQ(found, 3) << path;
    picture.channels = kind == '5' ? 1 : 3;
    picture.pixels = picture.bytes.data() + header + 1;
    ASSERT_EQ(picture.bytes.size(), static_cast<std::size_t>(header) + 2 +
                                        static_cast<std::size_t>(picture.width) *
                                            static_cast<std::size_t>(picture.height) *
                                            static_cast<std::size_t>(picture.channels));
}

void ExpectWithin(const TPlainPicture& expected, TZmBitmap& actual, int bound) {
    ASSERT_EQ(actual.GetWidth(), expected.width);
    ASSERT_EQ(actual.GetHeight(), expected.height);
    for (std::int32_t y = 0; y < expected.height; ++y) {
        for (std::int32_t x = 0; x < expected.width; ++x) {
            const std::uint8_t* pixel = expected.Pixel(x, y);
            const TRGB color = actual.GetPixels(x, y);
            const int last = expected.channels - 1;
            ASSERT_LE(std::abs(color.r - pixel[0]), bound) << "x " << x << " y " << y;
            ASSERT_LE(std::abs(color.g - pixel[last / 2]), bound) << "x " << x << " y " << y;
            ASSERT_LE(std::abs(color.b - pixel[last]), bound) << "x " << x << " y " << y;
        }
    }
}

bool IsOnCommandLine(const std::filesystem::path& path) {
    return path.string().find_first_of(" '\"#&()") == std::string::npos;
}

/// Saves through the driver, as programs do.
TBytes SaveTo(const TempFolder& folder, const std::string& name, TZmBitmap& bitmap,
              std::int32_t type, TIOParams& params) {
    EXPECT_TRUE(bitmap.Write(folder.Name(name), type, &params));
    return ReadFileBytes(folder.File(name));
}

TEST(CodecTools, WrittenPngsPassTheirCheckerWithTextsAndResolution) {
    const TempFolder folder;
    if (!HasTool("pngcheck -h", folder)) {
        GTEST_SKIP() << "pngcheck is not installed";
    }
    struct {
        TZmPixelFormat format;
        std::int32_t samples;
        std::int32_t bits;
        bool interlaced;
        const char* layout;
    } const cases[] = {{zm1g, 1, 1, false, "1-bit grayscale"},
                       {zm8p, 1, 8, true, "8-bit palette"},
                       {zm8g, 1, 8, false, "8-bit grayscale"},
                       {zm16g, 1, 16, true, "16-bit grayscale"},
                       {zm24RGB, 3, 8, false, "24-bit RGB"}};
    for (const auto& one : cases) {
        const auto bitmap = MakeGradient(one.format, 33, 21);
        TIOParams params;
        params.fSamplesPerPixel = one.samples;
        params.fBitsPerSample = one.bits;
        params.fPNG_Interlaced = one.interlaced;
        params.SetDpiX(300);
        params.SetDpiY(72);
        params.fPNG_TextKeys = {"Title", "Author"};
        params.fPNG_TextValues = {"the first", "the second"};
        SaveTo(folder, "out.png", *bitmap, ioPNG, params);
        const TProcessResult result =
            RunProcess("pngcheck -vt " + folder.File("out.png").string(), folder.Path());
        EXPECT_EQ(result.exit_status, 0) << result.standard_output;
        const auto has = [&result](const std::string& text) {
            return result.standard_output.find(text) != std::string::npos;
        };
        EXPECT_TRUE(has(one.layout)) << result.standard_output;
        EXPECT_EQ(has("non-interlaced"), !one.interlaced) << result.standard_output;
        EXPECT_TRUE(has("11811x2835 pixels/meter")) << result.standard_output;
        EXPECT_TRUE(has("the first") && has("the second")) << result.standard_output;
    }
}

TEST(CodecTools, WrittenPngsHaveTheSamePixelsForAnotherProgram) {
    const TempFolder folder;
    if (!HasTool("convert -version", folder)) {
        GTEST_SKIP() << "convert is not installed";
    }
    for (const TZmPixelFormat format : {zm1g, zm8p, zm8g, zm24RGB, zm48RGB}) {
        for (const bool interlaced : {false, true}) {
            const auto bitmap = MakeNoise(format, 33, 21, 8);
            TIOParams params;
            params.fPNG_Interlaced = interlaced;
            params.UpdateBPSAndSPP(format);
            SaveTo(folder, "out.png", *bitmap, ioPNG, params);
            const std::filesystem::path out = folder.File("out.ppm");
            const std::string command =
                "convert " + folder.File("out.png").string() + " -depth 8 PPM:" + out.string();
            ASSERT_EQ(RunProcess(command, folder.Path()).exit_status, 0);
            TPlainPicture seen;
            ReadPlainPicture(out, seen);
            ExpectWithin(seen, *bitmap, 0);
        }
    }
}

TEST(CodecTools, WrittenPngsHaveTheSameAlphaForAnotherProgram) {
    const TempFolder folder;
    if (!HasTool("convert -version", folder)) {
        GTEST_SKIP() << "convert is not installed";
    }
    const auto bitmap = MakeNoise(zm24RGB, 33, 21, 8);
    AddNoiseAlpha(*bitmap, 5);
    TIOParams params;
    SaveTo(folder, "out.png", *bitmap, ioPNG, params);
    const std::filesystem::path out = folder.File("out.pgm");
    const std::string command = "convert " + folder.File("out.png").string() +
                                " -alpha extract -depth 8 PGM:" + out.string();
    ASSERT_EQ(RunProcess(command, folder.Path()).exit_status, 0);
    TPlainPicture seen;
    ReadPlainPicture(out, seen);
    ASSERT_EQ(seen.channels, 1);
    for (std::int32_t y = 0; y < 21; ++y) {
        for (std::int32_t x = 0; x < 33; ++x) {
            ASSERT_EQ(*seen.Pixel(x, y), bitmap->GetAlpha(x, y)) << "x " << x << " y " << y;
        }
    }
}

TEST(CodecTools, WrittenJpegsOpenInTheLibrarysDecoder) {
    const TempFolder folder;
    if (!HasTool("djpeg -version", folder)) {
        GTEST_SKIP() << "djpeg is not installed";
    }
    const auto bitmap = MakeGradient(zm24RGB, 64, 48);
    for (const TIOJPEGColorspace space : {ioJPEG_YCbCr, ioJPEG_GRAYLEV, ioJPEG_CMYK}) {
        for (const bool progressive : {false, true}) {
            TIOParams params;
            params.fJPEG_ColorSpace = space;
            params.fJPEG_Progressive = progressive;
            params.fJPEG_OptimalHuffman = true;
            params.fJPEG_MarkerList.AddMarker(kMarkerComment, TBytes{'n', 'o', 't', 'e'});
            SaveTo(folder, "out.jpg", *bitmap, ioJPEG, params);
            const std::filesystem::path out = folder.File("out.ppm");
            const TProcessResult result =
                RunProcess("djpeg -verbose -verbose -dct int -pnm -outfile " + out.string() + " " +
                               folder.File("out.jpg").string(),
                           folder.Path());
            ASSERT_EQ(result.exit_status, 0) << result.standard_error;
            EXPECT_NE(result.standard_error.find("note"), std::string::npos);
            EXPECT_EQ(result.standard_error.find("orrupt"), std::string::npos);
            TPlainPicture seen;
            ReadPlainPicture(out, seen);
            TZmBitmap again;
            ASSERT_TRUE(again.Read(folder.Name("out.jpg"), &params, /*check_unknown=*/true));
            ExpectWithin(seen, again, 1);
        }
    }
}

TEST(CodecTools, WrittenFilesTellSizeAndResolutionToAnotherProgram) {
    const TempFolder folder;
    if (!HasTool("identify -version", folder)) {
        GTEST_SKIP() << "identify is not installed";
    }
    const auto bitmap = MakeGradient(zm24RGB, 64, 48);
    TIOParams params;
    params.SetDpiX(150);
    params.SetDpiY(75);
    params.fJPEG_Progressive = true;
    SaveTo(folder, "out.jpg", *bitmap, ioJPEG, params);
    const TProcessResult result = RunProcess(
        "identify -units PixelsPerInch -format '%m %w %h %x %y %[jpeg:sampling-factor] %Q "
        "%[interlace]' " +
            folder.File("out.jpg").string(),
        folder.Path());
    EXPECT_EQ(result.standard_output, "JPEG 64 48 150 75 2x2,1x1,1x1 80 JPEG");
}

TEST(CodecTools, TurnedPhotosLieAsAnotherProgramTurnsThem) {
    const TempFolder folder;
    if (!CorpusFolder() || !HasTool("convert -version", folder)) {
        GTEST_SKIP() << "convert or the folder of sample files is not there";
    }
    int files = 0;
    for (const CorpusEntry& entry : CorpusEntries()) {
        const std::size_t at = entry.note.find("orient");
        const bool lies = entry.format == "jpeg" && at != std::string::npos &&
                          entry.note[at + 6] > '1' && IsOnCommandLine(entry.path);
        if (!lies) {
            continue;
        }
        SCOPED_TRACE(entry.path.string());
        const std::filesystem::path out = folder.File("out.ppm");
        const std::string command =
            "convert " + entry.path.string() + " -auto-orient -depth 8 PPM:" + out.string();
        ASSERT_EQ(RunProcess(command, folder.Path()).exit_status, 0);
        TIOParams params;
        params.fJPEG_EnableAdjustOrientation = true;
        TZmBitmap bitmap;
        ASSERT_TRUE(bitmap.Read(EngineName(entry.path), &params, /*check_unknown=*/true));
        TPlainPicture expected;
        ReadPlainPicture(out, expected);
        ExpectWithin(expected, bitmap, 1);
        ++files;
    }
    EXPECT_GT(files, 5);
}

}  // namespace
}  // namespace zm::test
