#include "engine/io/zmioparams.h"

#include <gtest/gtest.h>

#include <array>
#include <string>
#include <utility>
#include <vector>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmprogress.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

const TBytes kExifData{'E', 'x', 'i', 'f', 0, 0, 1, 2};
const TBytes kOtherData{'h', 't', 't', 'p', 0, 0, 1, 2};

class IOParams : public ::testing::Test {
protected:
    void TearDown() override { DestroySingletonInstance(); }
};

TEST_F(IOParams, DefaultsComeFromTheSettings) {
    TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    settings.fDefaultDPIX = 72;
    settings.fDefaultDPIY = 73;
    TIOParamDefaults& defaults = settings.fIOParamDefaults;
    defaults.JPEG_Quality = 33;
    defaults.JPEG_DCTMethod = 2;
    defaults.JPEG_Scale = 3;
    defaults.EnableAdjustOrientation = true;
    defaults.RAW_EmbeddedJpegMinHeight = 801;
    const TIOParams params;
    EXPECT_EQ(std::pair(72, 73), std::pair(params.GetDpiX(), params.GetDpiY()));
    EXPECT_EQ((std::array{33, 33, 33}), (std::array{params.fJPEG_Quality, params.fTIFF_JPEGQuality,
                                                    params.fDICOM_JPEGQuality}));
    EXPECT_EQ(ioJPEG_FLOAT, params.fJPEG_DCTMethod);
    EXPECT_EQ(ioJPEG_QUARTER, params.fJPEG_Scale);
    EXPECT_TRUE(params.fEnableAdjustOrientation && params.fTIFF_EnableAdjustOrientation &&
                params.fJPEG_EnableAdjustOrientation);
    EXPECT_EQ(800, params.fRAW_EmbeddedJpegMinWidth);
    EXPECT_EQ(801, params.fRAW_EmbeddedJpegMinHeight);
    EXPECT_GT(params.fTGA_Date, 44000);  // a whole day after 2020
    EXPECT_EQ(params.fTGA_Date, static_cast<std::int32_t>(params.fTGA_Date));
}

TEST_F(IOParams, SizeFollowsTheAttachedBitmap) {
    TZmBitmap bitmap(7, 5, zm24RGB);
    TIOParams params(&bitmap);
    EXPECT_EQ(7, params.fWidth);
    EXPECT_EQ(5, params.fHeight);
    EXPECT_EQ(300, params.GetDpiX());
    params.SetDpiX(96);
    params.SetDefaultParams();
    EXPECT_EQ(96, params.GetDpiX());  // a bitmap keeps its resolution
    TIOParams alone;
    alone.SetDpiX(96);
    alone.SetDefaultParams();
    EXPECT_EQ(300, alone.GetDpiX());
}

TEST_F(IOParams, SettersWriteTheFieldsOfTheFormatsToo) {
    TIOParams params;
    params.SetDpiX(96);
    params.SetDpiY(97);
    EXPECT_EQ(96, params.fEXIF_XResolution);
    EXPECT_EQ(97, params.fEXIF_YResolution);
    params.SetImageIndex(4);
    EXPECT_EQ((std::array{4, 4, 4, 4, 4}),
              (std::array{params.fTIFF_ImageIndex, params.fDCX_ImageIndex, params.fGIF_ImageIndex,
                          params.fICO_ImageIndex, params.fCUR_ImageIndex}));
    params.SetImageCount(6);
    EXPECT_EQ((std::array{6, 6, 6, 6}),
              (std::array{params.fTIFF_ImageCount, params.fGIF_ImageCount, params.fAVI_FrameCount,
                          params.fMEDIAFILE_FrameCount}));
}

/// Parameters with something of every kind of information.
void FillInfo(TIOParams& params) {
    params.fEXIF_HasEXIFData = true;
    params.fEXIF_Make = "maker";
    params.fEXIF_SubjectLocationX = 5;
    params.fEXIF_Bitmap = std::make_unique<TZmBitmap>(3, 2, zm8g);
    params.fJPEG_MarkerList.AddMarker(kMarkerComment, kOtherData);
    params.fJPEG_MarkerList.AddMarker(kMarkerApp1, kOtherData);
    params.fJPEG_MarkerList.AddMarker(kMarkerApp1, kExifData);
    params.fJPEG_MarkerList.AddMarker(kMarkerApp2, kOtherData);
    params.fXMP_Info = "packet";
    params.fPNG_TextKeys = {"Title"};
    params.fPNG_TextValues = {"Sea"};
    params.fPDF_Author = "me";
    params.fDICOM_RescaleSlope = 4;
}

TEST_F(IOParams, ResetInfoWithoutASetForgetsEverything) {
    TIOParams params;
    FillInfo(params);
    EXPECT_EQ(TZmMetaInfoItems(zmrEXIF, zmrJPEGMarkers, zmrXMP, zmrOtherTextMeta),
              params.ContainsInfo());
    params.ResetInfo();
    EXPECT_TRUE(params.ContainsInfo().IsEmpty());
    EXPECT_EQ("", params.fEXIF_Make);
    EXPECT_EQ(-1, params.fEXIF_SubjectLocationX);
    EXPECT_EQ(nullptr, params.fEXIF_Bitmap);
    EXPECT_EQ(1, params.fDICOM_RescaleSlope);
    EXPECT_EQ("", params.fPS_Title);
    EXPECT_EQ(80, params.fJPEG_Quality);
}

TEST_F(IOParams, ResetInfoWithASetForgetsThatOnly) {
    TIOParams params;
    FillInfo(params);
    params.ResetInfo(TZmMetaInfoItems(zmrJPEGMarkers));
    ASSERT_EQ(1, params.fJPEG_MarkerList.Count());
    EXPECT_EQ(kMarkerApp2, params.fJPEG_MarkerList.GetMarkerType(0));
    EXPECT_EQ("packet", params.fXMP_Info);
    EXPECT_TRUE(params.fEXIF_HasEXIFData);
    params.ResetInfo(TZmMetaInfoItems(zmrJPEGMarkers, zmrICC));
    EXPECT_EQ(0, params.fJPEG_MarkerList.Count());
    params.ResetInfo(TZmMetaInfoItems(zmrXMP));
    EXPECT_EQ(TZmMetaInfoItems(zmrEXIF, zmrOtherTextMeta), params.ContainsInfo());
    params.ResetInfo(TZmMetaInfoItems(zmrOtherTextMeta));
    EXPECT_EQ(TZmMetaInfoItems(zmrEXIF), params.ContainsInfo());
}

TEST_F(IOParams, ResetInfoForgetsTheKeptPngChunksOfItsKinds) {
    struct {
        TZmMetaInfoItem item;
        std::string left;
    } const cases[] = {{zmrEXIF, "pxt"},
                       {zmrICC, "ext"},
                       {zmrXMP, "ept"},
                       {zmrOtherTextMeta, "epx"},
                       {zmrIPTC, "epxt"}};
    for (const auto& one : cases) {
        TIOParams params;
        params.fPNG_Chunks.Add({kPngChunkExif, "e", "", "", {}});
        params.fPNG_Chunks.Add({kPngChunkProfile, "p", "", "", {}});
        params.fPNG_Chunks.Add({kPngChunkText, "XML:com.adobe.xmp", "", "x", {}});
        params.fPNG_Chunks.Add({kPngChunkText, "t", "", "", {}});
        params.ResetInfo(TZmMetaInfoItems(one.item));
        std::string left;
        for (std::int32_t i = 0; i < params.fPNG_Chunks.Count(); ++i) {
            const TZmPngChunk& chunk = params.fPNG_Chunks[i];
            left += chunk.translated_key.empty() ? chunk.key : chunk.translated_key;
        }
        EXPECT_EQ(one.left, left) << one.item;
        params.ResetInfo();
        EXPECT_EQ(0, params.fPNG_Chunks.Count());
    }
}

TEST_F(IOParams, ResetExifTakesOutTheFirstExifMarkerOnly) {
    TIOParams params;
    FillInfo(params);
    params.fJPEG_MarkerList.AddMarker(kMarkerApp1, kExifData);
    params.ResetEXIF();
    ASSERT_EQ(4, params.fJPEG_MarkerList.Count());
    EXPECT_EQ(kMarkerApp2, params.fJPEG_MarkerList.GetMarkerType(2));
    EXPECT_EQ(kMarkerApp1, params.fJPEG_MarkerList.GetMarkerType(3));
}

TEST_F(IOParams, AssignCopiesValuesAndClonesObjects) {
    TIOParams source;
    FillInfo(source);
    source.SetDpiX(96);
    source.SetImageIndex(2);
    source.fColorMap = {TRGB{1, 2, 3}};
    source.fColorMapCount = 1;
    source.fEXIF_Bitmap->Fill(9.0);
    TIOParams copy;
    copy.Assign(source);
    source.ResetInfo();
    source.FreeColorMap();
    EXPECT_EQ(96, copy.GetDpiX());
    EXPECT_EQ(2, copy.GetImageIndex());
    EXPECT_EQ("maker", copy.fEXIF_Make);
    EXPECT_EQ("Sea", copy.fPNG_TextValues.at(0));
    EXPECT_EQ(4, copy.fJPEG_MarkerList.Count());
    ASSERT_EQ(1u, copy.fColorMap.size());
    EXPECT_EQ((TRGB{1, 2, 3}), copy.fColorMap[0]);
    ASSERT_NE(nullptr, copy.fEXIF_Bitmap);
    EXPECT_EQ(9, copy.fEXIF_Bitmap->GetPixels_zm8(2, 1));
    copy.Assign(copy);
    EXPECT_EQ("maker", copy.fEXIF_Make);
}

TEST_F(IOParams, AssignCompressionInfoLeavesMetadataBehind) {
    TIOParams source;
    FillInfo(source);
    source.SetDpiX(96);
    source.fBitsPerSample = 11;
    source.fPDF_Compression = ioPDF_LZW;
    TIOParams target;
    target.AssignCompressionInfo(source);
    EXPECT_EQ(11, target.fBitsPerSample);
    EXPECT_EQ(ioPDF_LZW, target.fPDF_Compression);
    EXPECT_EQ(300, target.GetDpiX());
    EXPECT_TRUE(target.ContainsInfo().IsEmpty());
}

TEST_F(IOParams, DepthAndChannelsFollowTheFormat) {
    struct TRow {
        TZmPixelFormat format;
        std::int32_t bits;
        std::int32_t samples;
    };
    for (const TRow& row : {TRow{zm1g, 1, 1}, TRow{zm8p, 8, 1}, TRow{zm8g, 8, 1},
                            TRow{zm16g, 16, 1}, TRow{zm24RGB, 8, 3}, TRow{zm32f, 32, 1},
                            TRow{zmCMYK, 8, 4}, TRow{zm48RGB, 16, 3}, TRow{zmCIELab, 8, 3}}) {
        TIOParams params;
        params.UpdateBPSAndSPP(row.format);
        EXPECT_EQ(row.bits, params.fBitsPerSample) << row.format;
        EXPECT_EQ(row.samples, params.fSamplesPerPixel) << row.format;
        EXPECT_EQ(row.format == zm8g ? ioJPEG_GRAYLEV : ioJPEG_YCbCr, params.fJPEG_ColorSpace);
    }
}

TEST_F(IOParams, LoadingForDisplayChoosesScaleAndSpeed) {
    TIOParams params;
    params.OptimizeLoadingParams(250, 249);
    EXPECT_EQ(ioJPEG_AUTOCALC, params.fJPEG_Scale);
    EXPECT_EQ(ioJPEG_IFAST, params.fJPEG_DCTMethod);
    EXPECT_EQ(250, params.fWidth);
    EXPECT_EQ(249, params.fHeight);
    EXPECT_TRUE(params.fRAW_HalfSize && params.fRAW_GetEmbeddedJpeg);
    EXPECT_EQ(zmrlScaled, params.fRAW_EmbeddedJpegLoading);
    params.OptimizeLoadingParams(1401, 100);
    EXPECT_EQ(ioJPEG_ISLOW, params.fJPEG_DCTMethod);
    EXPECT_FALSE(params.fRAW_HalfSize);
    EXPECT_EQ(100, params.fRAW_EmbeddedJpegMinHeight);
    params.OptimizeLoadingParams(1401, 0);
    EXPECT_EQ(ioJPEG_FULLSIZE, params.fJPEG_Scale);
    EXPECT_FALSE(params.fRAW_GetEmbeddedJpeg);
    EXPECT_EQ(800, params.fRAW_EmbeddedJpegMinWidth);
    EXPECT_EQ(zmrlDefault, params.fRAW_EmbeddedJpegLoading);
}

TEST_F(IOParams, CoordinatesAreFoldedIntoTheirRanges) {
    TIOParams params;
    params.fEXIF_GPSLatitudeDegrees = 41.5;
    params.fEXIF_GPSLatitudeMinutes = 61;
    params.fEXIF_GPSLatitudeSeconds = 75.25;
    params.fEXIF_GPSLatitudeRef = "South";
    params.fEXIF_GPSDestLongitudeDegrees = -1;
    params.fEXIF_GPSDestLongitudeRef = "E";
    params.AdjustGPSCoordinates();
    EXPECT_EQ(42, params.fEXIF_GPSLatitudeDegrees);
    EXPECT_EQ(32, params.fEXIF_GPSLatitudeMinutes);
    EXPECT_EQ(15.25, params.fEXIF_GPSLatitudeSeconds);
    EXPECT_EQ("S", params.fEXIF_GPSLatitudeRef);
    EXPECT_EQ(1, params.fEXIF_GPSDestLongitudeDegrees);
    EXPECT_EQ("W", params.fEXIF_GPSDestLongitudeRef);
    EXPECT_EQ("", params.fEXIF_GPSLongitudeRef);
}

TEST(MarkerList, KeepsOrderAndBearsIndicesOutside) {
    TZmMarkerList list;
    EXPECT_EQ(0, list.AddMarker(0xFE, TBytes{1}));
    EXPECT_EQ(1, list.AddMarker(0xE1, TBytes{2}));
    EXPECT_EQ(2, list.AddMarker(0xFE, TBytes{3}));
    list.SetMarker(0xFE, TBytes{4, 5});
    list.InsertMarker(99, 0xE1, TBytes{6});
    EXPECT_EQ(2, list.GetMarkerLength(0));
    EXPECT_EQ(1, list.IndexOf(0xE1));
    list.Sort();
    std::vector<int> firsts;
    for (std::int32_t i = 0; i < list.Count(); ++i) {
        firsts.push_back(list.GetMarkerData(i)[0]);
    }
    EXPECT_EQ((std::vector<int>{2, 6, 4, 3}), firsts);
    EXPECT_EQ(0, list.GetMarkerType(4));
    EXPECT_TRUE(list.GetMarkerData(-1).empty());
    list.DeleteMarker(4);
    list.DeleteMarkerInstances(0xFE);
    EXPECT_EQ(2, list.Count());
    list.ClearExcept(0xE0);
    EXPECT_EQ(-1, list.IndexOf(0xE1));
}

TEST(ByteReader, ReadsBothOrdersAndRemembersTheEnd) {
    const TBytes bytes{0x01, 0x82, 0x03, 0x84, 0x05, 0x86, 0x07};
    TZmByteReader reader(bytes);
    EXPECT_EQ(0x8201, reader.U16LE());
    EXPECT_EQ(0x0384, reader.U16BE());
    reader.MoveTo(1);
    EXPECT_EQ(0x05840382u, reader.U32LE());
    EXPECT_FALSE(reader.HasFailed());
    EXPECT_EQ(0u, reader.U32BE());  // two bytes are left
    EXPECT_TRUE(reader.HasFailed());
    EXPECT_EQ(0u, reader.Remaining());
    TZmByteReader skipper(bytes);
    skipper.Skip(static_cast<std::size_t>(-1));
    EXPECT_TRUE(skipper.HasFailed());
    EXPECT_EQ(0, skipper.U8());
}

TEST(ImageLimits, GrowWithTheFileAndCatchOverflow) {
    struct TRow {
        std::int64_t width, height;
        std::int32_t bits;
        std::int64_t file_bytes;
        bool acceptable;
    };
    constexpr std::int64_t kMost32 = 2147483647;
    for (const TRow& row :
         {TRow{1, 1, 1, 0, true}, TRow{0, 1, 24, 100, false}, TRow{1, -1, 24, 100, false},
          TRow{1, 1, 0, 100, false}, TRow{16384, 32768, 8, 0, true},  // 512 MiB
          TRow{16384, 32769, 8, 0, false},                            // one row more
          TRow{16384, 32769, 8, 14, false},                           // 15,400 bytes more
          TRow{16384, 32769, 8, 15, true},                            // 16,500 bytes more
          TRow{kMost32, 1, 8, kMost32, true}, TRow{kMost32, 1, 9, kMost32, false},
          TRow{kMost32 + 1, 1, 1, kMost32, false},
          TRow{2, kMost32, 8, std::int64_t{1} << 62, sizeof(void*) > 4},
          TRow{kMost32, kMost32, 64, std::int64_t{1} << 62, false},
          TRow{16384, 32769, 8, -5, false}}) {
        EXPECT_EQ(row.acceptable,
                  ImageSizeIsAcceptable(row.width, row.height, row.bits, row.file_bytes))
            << row.width << " x " << row.height << " x " << row.bits;
    }
}

TEST(Progress, ReportsChangesOfThePercentAndAsksForTheEnd) {
    bool aborting = false;
    std::vector<std::int32_t> percents;
    TProgressRec progress;
    progress.fOnProgress = [&](void*, std::int32_t percent) {
        percents.push_back(percent);
        aborting = percent >= 66;
    };
    progress.Aborting = &aborting;
    progress.per1 = 100.0 / 300;
    std::vector<bool> goes_on;
    for (const std::int64_t row : {0, 1, 2, 3, 99, 100, 199}) {
        goes_on.push_back(StepProgress(progress, row));
    }
    EXPECT_EQ((std::vector<std::int32_t>{1, 33, 66}), percents);
    EXPECT_EQ((std::vector<bool>{true, true, true, true, true, true, false}), goes_on);
}

}  // namespace
}  // namespace zm
