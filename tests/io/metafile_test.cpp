#include <gtest/gtest.h>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "tests/support/testfiles.h"
#include "tests/support/testmetafile.h"

// Metafiles through the driver: the left half of the picture is red.
namespace zm::test {
namespace {

constexpr TRGB kRedPixel{0, 0, 255};
constexpr TRGB kWhitePixel{255, 255, 255};
/// Systems round the size that the frame tells in their own ways.
constexpr std::int32_t kSlack = 1;

std::vector<std::uint8_t> HalfRed() {
    TMetafileRecorder recorder;
    recorder.SelectBrush(0x0000FF);
    recorder.Add(43, {0, 0, 41, 41});
    return recorder.Finish();
}

void ExpectHalfRed(TZmBitmap& bitmap, std::int32_t width, std::int32_t height) {
    ASSERT_NEAR(bitmap.GetWidth(), width, kSlack);
    ASSERT_NEAR(bitmap.GetHeight(), height, kSlack);
    EXPECT_EQ(bitmap.GetPixelFormat(), zm24RGB);
    for (const std::int32_t y : {2, height - 4}) {
        EXPECT_EQ(bitmap.GetPixels(2, y), kRedPixel);
        EXPECT_EQ(bitmap.GetPixels(width / 2 - 4, y), kRedPixel);
    }
}

TEST(MetafileImport, FilesAreDrawnAtTheirOwnSizeOnWhite) {
    const TempFolder folder;
    WriteFileBytes(folder.File("half.emf"), HalfRed());
    TZmBitmap bitmap;
    TIOParams params;
    ASSERT_TRUE(bitmap.Read(folder.Name("half.emf"), &params, /*check_unknown=*/true));
    ExpectHalfRed(bitmap, 80, 40);
    EXPECT_EQ(bitmap.GetPixels(60, 20), kWhitePixel);
    EXPECT_FALSE(bitmap.HasAlphaChannel());
    EXPECT_EQ(params.fFileType, ioEMF);
    EXPECT_EQ(params.fWidth, bitmap.GetWidth());

    TZalmoIO driver;
    ASSERT_TRUE(driver.ParamsFromFile(folder.Name("half.emf"), ioUnknown));
    EXPECT_EQ(driver.GetParams()->fHeight, bitmap.GetHeight());
    EXPECT_TRUE(driver.GetZmBitmap()->IsEmpty());
}

TEST(MetafileImport, SizesAreWantedFollowedAndLimited) {
    const TempFolder folder;
    WriteFileBytes(folder.File("half.emf"), HalfRed());
    struct TCase {
        TPoint wanted;
        TPoint found;
        std::int32_t longest_side;
    };
    for (const TCase& test : {TCase{{160, 20}, {160, 20}, 8000}, TCase{{160, 0}, {160, 80}, 8000},
                              TCase{{-1, 10}, {20, 10}, 8000}, TCase{{1000, 500}, {60, 30}, 60}}) {
        TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
        const std::int32_t before = settings.fMaxImageEMFSize;
        settings.fMaxImageEMFSize = test.longest_side;
        TZalmoIO driver;
        EXPECT_TRUE(driver.ImportMetafile(folder.Name("half.emf"), test.wanted.x, test.wanted.y,
                                          /*with_alpha=*/false));
        settings.fMaxImageEMFSize = before;
        ExpectHalfRed(*driver.GetZmBitmap(), test.found.x, test.found.y);
    }
}

TEST(MetafileImport, WhatIsNotDrawnOnIsTransparent) {
    const TempFolder folder;
    WriteFileBytes(folder.File("half.emf"), HalfRed());
    TZalmoIO driver;
    ASSERT_TRUE(driver.ImportMetafile(folder.Name("half.emf"), 0, 0, /*with_alpha=*/true));
    TZmBitmap& bitmap = *driver.GetZmBitmap();
    ExpectHalfRed(bitmap, 80, 40);
    ASSERT_TRUE(bitmap.HasAlphaChannel());
    EXPECT_EQ(bitmap.GetAlpha(5, 20), 255);
    EXPECT_EQ(bitmap.GetAlpha(60, 20), 0);
}

TEST(MetafileImport, CutFilesFail) {
    auto bytes = HalfRed();
    for (std::size_t count = 0; count < 88; count += 11) {
        TZalmoIO driver;
        EXPECT_FALSE(driver.LoadFromBuffer(bytes.data(), static_cast<std::int64_t>(count), ioEMF));
        EXPECT_TRUE(driver.GetAborting());
    }
    TZalmoIO driver;
    EXPECT_ANY_THROW(driver.ImportMetafile(u"not there.emf", 0, 0, /*with_alpha=*/false));
}

}  // namespace
}  // namespace zm::test
