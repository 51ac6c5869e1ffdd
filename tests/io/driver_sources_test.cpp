#include <string>
#include <vector>

#include "engine/metadata/zmmetahooks.h"
#include "tests/io/driverfixture.h"

// Headers without images, images in a row, images from modules and as text, and what the driver
// does around a codec.
namespace zm {
namespace {

using test::TBytes;

constexpr std::int32_t kManyType = 9001;

/// A file of three images: the pixel tells which one was asked for.
void ReadOneOfThree(TStream&, TZmBitmap& bitmap, TIOParams& params, TProgressRec& progress,
                    bool preview) {
    params.SetImageCount(3);
    params.fWidth = params.fHeight = 1;
    if (preview) {
        return;
    }
    *progress.Aborting = !bitmap.Allocate(1, 1, zm8g);
    bitmap.SetPixels_zm8(0, 0, static_cast<std::uint8_t>(params.GetImageIndex()));
}

using DriverSources = test::DriverFixture;

TEST_F(DriverSources, ParametersComeWithoutTheImage) {
    io_->GetParams()->SetDpiX(123);
    io_->GetParams()->SetDpiY(124);
    for (const std::int32_t type : {ioBMP, ioPNG, ioJPEG, ioWBMP}) {
        const TBytes bytes = SavedAs(type);
        const auto size = static_cast<std::int64_t>(bytes.size());
        TZmBitmap bitmap(3, 2, zm8g);
        const auto reader = TZalmoIO::CreateFromBitmap(&bitmap);
        EXPECT_TRUE(reader->ParamsFromBuffer(bytes.data(), size, type)) << type;
        EXPECT_EQ(12, reader->GetParams()->fWidth) << type;
        EXPECT_EQ(9, reader->GetParams()->fHeight) << type;
        EXPECT_EQ(type, reader->GetParams()->fFileType);
        EXPECT_EQ(type == ioWBMP ? 300 : 123, reader->GetParams()->GetDpiX()) << type;
        EXPECT_EQ(3, bitmap.GetWidth());
        EXPECT_FALSE(reader->ParamsFromBuffer(bytes.data(), 3, type)) << type;
        EXPECT_EQ(0, reader->GetParams()->fFileType);
        EXPECT_TRUE(reader->GetAborting());

        const std::u16string name = folder_.Name("a.bin");
        test::WriteFileBytes(folder_.File("a.bin"), bytes);
        TIOParams params;
        EXPECT_TRUE(params.Read(name, std::int32_t{type})) << type;
        EXPECT_EQ(name, params.fFileName);
        EXPECT_EQ(type != ioWBMP, params.Read(name, /*use_extension=*/true)) << type;
        TBorrowedMemoryStream stream(bytes.data(), size);
        EXPECT_EQ(type != ioWBMP, params.Read(stream, 0)) << type;
        EXPECT_EQ(type == ioWBMP ? 0 : 12, params.fWidth * (params.fFileType != 0)) << type;
        EXPECT_TRUE(params.Read(bytes.data(), size, type));
    }
}

TEST_F(DriverSources, ParametersOfWhatIsNoImage) {
    const TBytes text{'t', 'e', 'x', 't'};
    TBorrowedMemoryStream stream(text.data(), 4);
    io_->GetParams()->fFileType = ioPNG;
    EXPECT_FALSE(io_->ParamsFromStream(stream, 0));
    EXPECT_EQ(0, io_->GetParams()->fFileType);
    EXPECT_EQ(1, finish_count_);
    EXPECT_FALSE(io_->ParamsFromStreamFormat(stream, 0));
    EXPECT_FALSE(io_->ParamsFromFileFormat(folder_.Name("a"), 0));
    EXPECT_FALSE(io_->ParamsFromStream(stream, ioHEIF));
    EXPECT_FALSE(io_->ParamsFromBuffer(nullptr, 4, ioPNG));
    EXPECT_EQ(1, finish_count_);
    EXPECT_THROW(io_->ParamsFromFile(folder_.Name("none"), std::int32_t{ioPNG}), EFOpenError);
    EXPECT_TRUE(io_->GetAborting());
}

TEST_F(DriverSources, AHeaderAloneTellsTheResolutionThatALoadWould) {
    io_->GetParams()->SetDpiX(1);
    io_->GetParams()->SetDpiY(2);
    const TBytes jpeg = SavedAs(ioJPEG);
    const auto size = static_cast<std::int64_t>(jpeg.size());
    ZmGlobalSettings().fDefaultDPIX = 123;
    for (const bool is_whole : {false, true}) {
        ASSERT_TRUE(is_whole ? io_->LoadFromBuffer(jpeg.data(), size, ioJPEG)
                             : io_->ParamsFromBuffer(jpeg.data(), size, ioJPEG));
        EXPECT_EQ(123, io_->GetParams()->GetDpiX());
        EXPECT_EQ(2, io_->GetParams()->GetDpiY());
        EXPECT_EQ(123, io_->GetParams()->fEXIF_XResolution);
    }
}

TEST_F(DriverSources, SeekStaysWithinTheImages) {
    test::RegisterRow(kManyType, "MANY", ReadOneOfThree);
    test::WriteFileBytes(folder_.File("a.many"), {1});
    struct TStep {
        TZmIOSeekDestination destination;
        std::int32_t expected;
    };
    for (const TStep& step :
         {TStep{zmioSeekPrior, 0}, TStep{zmioSeekNext, 1}, TStep{zmioSeekNext, 2},
          TStep{zmioSeekNext, 2}, TStep{zmioSeekPrior, 1}, TStep{zmioSeekLast, 2},
          TStep{zmioSeekFirst, 0}}) {
        EXPECT_EQ(step.expected, io_->Seek(step.destination, folder_.Name("a.many")));
        EXPECT_EQ(step.expected, image_->GetPixels_zm8(0, 0));
    }
    TMemoryStream stream(TBytes{1, 2, 3});
    stream.SetPosition(1);
    EXPECT_EQ(2, io_->Seek(zmioSeekLast, stream, kManyType));
    EXPECT_EQ(2, io_->GetParams()->fGIF_ImageIndex);
    EXPECT_EQ(-1, io_->Seek(zmioSeekLast, stream, ioPNG));
}

TEST_F(DriverSources, StreamHeadersLetImagesFollowOneAnother) {
    io_->SetStreamHeaders(true);
    TMemoryStream stream;
    stream.WriteBuffer("head", 4);
    ASSERT_TRUE(io_->SaveToStreamJpeg(stream));
    const std::int64_t second = stream.GetPosition();
    ASSERT_TRUE(image_->Crop(0, 0, 4, 3, kCropNoFill));
    ASSERT_TRUE(io_->SaveToStreamJpeg(stream));
    const std::int64_t end = stream.GetPosition();

    const auto length = static_cast<std::uint8_t>((second - 16) & 0xFF);
    const auto high = static_cast<std::uint8_t>((second - 16) >> 8);
    const TBytes header{'J', 'F', 'I', 'F', 0, 0, 0, 0, length, high, 0, 0, 0xFF, 0xD8};
    EXPECT_EQ(header, TBytes(stream.Bytes().begin() + 4, stream.Bytes().begin() + 18));

    stream.SetPosition(4);
    TZalmoIO reader;
    reader.SetStreamHeaders(true);
    ASSERT_TRUE(reader.LoadFromStream(stream, 0));
    EXPECT_EQ(12, reader.GetZmBitmap()->GetWidth());
    EXPECT_EQ(second, stream.GetPosition());
    ASSERT_TRUE(reader.LoadFromStreamJpeg(stream));
    EXPECT_EQ(5, reader.GetZmBitmap()->GetWidth());
    EXPECT_EQ(end, stream.GetPosition());

    stream.SetPosition(16);  // plain data are taken as they are
    EXPECT_TRUE(reader.LoadFromStreamJpeg(stream));
    EXPECT_EQ(12, reader.GetZmBitmap()->GetWidth());

    // An aborted save leaves no header.
    TMemoryStream aborted;
    io_->SetOnProgress([this](void*, std::int32_t) { io_->SetAborting(true); });
    EXPECT_FALSE(io_->SaveToStreamJpeg(aborted));
    EXPECT_EQ(TBytes(12), TBytes(aborted.Bytes().begin(), aborted.Bytes().begin() + 12));
    io_->SetOnProgress({});
    // Files have none.
    ASSERT_TRUE(io_->SaveToFileJpeg(folder_.Name("a.jpg")));
    EXPECT_EQ(0xFF, test::ReadFileBytes(folder_.File("a.jpg"))[0]);
}

TEST_F(DriverSources, UnequalResolutionsAreMadeEqual) {
    struct TRow {
        std::int32_t width, height, dpi_x, dpi_y;
        std::int32_t new_width, new_height, new_dpi;
    };
    for (const TRow& row :
         {TRow{100, 50, 200, 100, 100, 100, 200}, TRow{50, 100, 100, 300, 150, 100, 300},
          TRow{9, 9, 300, 100, 3, 9, 100},  // equal sides: the width follows
          TRow{7, 5, 150, 100, 7, 7, 150}}) {
        for (const bool is_filtered : {false, true}) {
            const auto image = test::MakeGradient(zm24RGB, row.width, row.height);
            test::AddNoiseAlpha(*image, 7);
            const auto writer = TZalmoIO::CreateFromBitmap(image.get());
            writer->GetParams()->SetDpiX(row.dpi_x);
            writer->GetParams()->SetDpiY(row.dpi_y);
            TMemoryStream stream;
            ASSERT_TRUE(writer->SaveToStreamPNG(stream));
            stream.SetPosition(0);
            TZalmoIO reader;
            reader.SetAutoAdjustDPI(true);
            reader.SetFilteredAdjustDPI(is_filtered);
            ASSERT_TRUE(reader.LoadFromStreamPNG(stream));
            TZmBitmap& loaded = *reader.GetZmBitmap();
            const TIOParams& params = *reader.GetParams();
            const std::pair new_size(row.new_width, row.new_height);
            EXPECT_EQ(new_size, std::pair(loaded.GetWidth(), loaded.GetHeight()));
            EXPECT_EQ(new_size, std::pair(params.fWidth, params.fHeight));
            EXPECT_EQ(std::pair(row.new_dpi, row.new_dpi),
                      std::pair(params.GetDpiX(), params.GetDpiY()));
            ASSERT_TRUE(loaded.HasAlphaChannel());
            EXPECT_EQ(row.new_width, loaded.GetAlphaChannel()->GetWidth());
            EXPECT_EQ(image->GetAlpha(0, 0), loaded.GetAlpha(0, 0));
            if (!is_filtered) {
                EXPECT_EQ(image->GetPixels_zm24RGB(0, 0), loaded.GetPixels_zm24RGB(0, 0));
            }
        }
    }
}

TEST_F(DriverSources, AWantedSizeIsNotTheSizeThatIsMadeEqual) {
    image_ = test::MakeGradient(zm24RGB, 64, 48);
    io_->AttachZmBitmap(image_.get());
    io_->GetParams()->SetDpiX(200);
    io_->GetParams()->SetDpiY(100);
    const TBytes jpeg = SavedAs(ioJPEG);
    TZalmoIO reader;
    reader.SetAutoAdjustDPI(true);
    reader.GetParams()->fJPEG_Scale = ioJPEG_AUTOCALC;
    reader.GetParams()->fWidth = reader.GetParams()->fHeight = 20;  // half the size covers it
    ASSERT_TRUE(LoadBytes(reader, jpeg, ioJPEG));
    EXPECT_EQ(32, reader.GetZmBitmap()->GetWidth());
    EXPECT_EQ(48, reader.GetZmBitmap()->GetHeight());
    EXPECT_EQ(48, reader.GetParams()->fHeight);
}

TEST_F(DriverSources, ResolutionsAloneDoNotAskForMemory) {
    TMemoryStream stream;
    io_->GetParams()->SetDpiX(65535);
    io_->GetParams()->SetDpiY(1);
    image_->Allocate(65000, 2, zm24RGB);
    image_->Fill(TRGBA{});
    ASSERT_TRUE(io_->SaveToStreamPNG(stream));
    stream.SetPosition(0);
    ZmGlobalSettings().fDefaultDPIY = 2;
    TZalmoIO reader;
    reader.SetAutoAdjustDPI(true);
    ASSERT_TRUE(reader.LoadFromStreamPNG(stream));
    EXPECT_EQ(2, reader.GetZmBitmap()->GetHeight());
}

TEST_F(DriverSources, TextForms) {
    TMemoryStream hex;
    ASSERT_TRUE(io_->SaveToText(hex, ioWBMP, zmtfHex));
    EXPECT_EQ("00000c09", std::string(hex.Bytes().begin(), hex.Bytes().begin() + 8));
    TMemoryStream base64;
    ASSERT_TRUE(image_->Crop(0, 0, 0, 0, kCropNoFill));
    image_->Fill(TRGBA{255, 255, 255, 255});
    ASSERT_TRUE(io_->SaveToText(base64, ioWBMP, zmtfBase64));  // bytes 00 00 01 01 80
    EXPECT_EQ("AAABAYA=", std::string(base64.Bytes().begin(), base64.Bytes().end()));
    ASSERT_TRUE(io_->SaveToText(folder_.Name("a.txt"), ioWBMP, zmtfBase64));
    EXPECT_EQ(8u, test::ReadFileBytes(folder_.File("a.txt")).size());
    EXPECT_THROW(io_->SaveToText(hex, ioWBMP, static_cast<TZmTextFormat>(9)), EZmException);
}

TEST_F(DriverSources, MetadataIsPutIntoAFileThatStaysAsItIs) {
    const std::u16string name = folder_.Name("a.jpg");
    ASSERT_TRUE(io_->SaveToFileJpeg(name));
    const TBytes plain = test::ReadFileBytes(folder_.File("a.jpg"));
    TIOParams& params = *io_->GetParams();
    params.WriteIPTCField(2, 120, "Sea");
    ASSERT_TRUE(io_->InjectJpegIPTC(name));
    TBytes exif{'E', 'x', 'i', 'f', 0, 0, 'I', 'I'};
    params.fJPEG_MarkerList.AddMarker(kMarkerApp1, exif);
    ASSERT_TRUE(io_->InjectJpegEXIF(name));
    TIOParams told;
    ASSERT_TRUE(told.Read(name, std::int32_t{ioJPEG}));
    EXPECT_EQ("Sea", told.ReadIPTCField(2, 120));
    EXPECT_EQ(kMarkerApp1, told.fJPEG_MarkerList.GetMarkerType(0));
    params.ResetInfo();
    ASSERT_TRUE(io_->InjectJpegEXIF(name));
    ASSERT_TRUE(io_->InjectJpegIPTC(name));
    EXPECT_EQ(plain, test::ReadFileBytes(folder_.File("a.jpg")));

    EXPECT_THROW(io_->InjectJpegIPTC(folder_.Name("none.jpg")), EFOpenError);
    EXPECT_TRUE(io_->GetAborting());
    test::WriteFileBytes(folder_.File("a.jpg"), {1, 2, 3});
    EXPECT_FALSE(io_->InjectJpegEXIF(name));
    EXPECT_EQ((TBytes{1, 2, 3}), test::ReadFileBytes(folder_.File("a.jpg")));
    EXPECT_EQ((std::vector<std::string>{"a.jpg"}), test::ListFolder(folder_.Path()));
}

int g_prepared = 0;

TEST_F(DriverSources, MarkersArePreparedOnceBeforeAJpegOnly) {
    MetadataHooks().prepare_jpeg_markers = [](TIOParams& params) {
        ++g_prepared;
        params.fJPEG_MarkerList.SetMarker(kMarkerComment, TBytes{'h', 'i'});
    };
    g_prepared = 0;
    SavedAs(ioPNG);
    EXPECT_EQ(0, g_prepared);
    const TBytes bytes = SavedAs(ioJPEG);
    MetadataHooks() = {};
    EXPECT_EQ(1, g_prepared);
    TIOParams told;
    ASSERT_TRUE(told.Read(bytes.data(), static_cast<std::int64_t>(bytes.size()), ioJPEG));
    EXPECT_EQ(2,
              told.fJPEG_MarkerList.GetMarkerLength(told.fJPEG_MarkerList.IndexOf(kMarkerComment)));
}

TEST_F(DriverSources, ThumbnailsAreMadeOfTheAttachedBitmap) {
    TIOParams& params = *io_->GetParams();
    ASSERT_TRUE(image_->SetPixelFormat(zm8g));
    image_->Fill(99.0);
    ASSERT_TRUE(params.UpdateEXIFThumbnail(5, 4, rfTriangle));
    EXPECT_EQ(zm24RGB, params.fEXIF_Bitmap->GetPixelFormat());
    EXPECT_EQ(5, params.fEXIF_Bitmap->GetWidth());
    EXPECT_EQ(4, params.fEXIF_Bitmap->GetHeight());
    EXPECT_EQ((TRGB{99, 99, 99}), params.fEXIF_Bitmap->GetPixels_zm24RGB(4, 3));
    EXPECT_FALSE(params.UpdateEXIFThumbnail(0, 4, rfTriangle));
    EXPECT_FALSE(params.UpdateEXIFThumbnail(2147483647, 2147483647, rfNone));
    EXPECT_EQ(5, params.fEXIF_Bitmap->GetWidth());
    EXPECT_FALSE(TIOParams().UpdateEXIFThumbnail(5, 4, rfTriangle));
}

TEST_F(DriverSources, WhatNeedsAViewOrAScreenFails) {
    io_->SetAborting(false);
    EXPECT_FALSE(io_->CaptureFromScreen());
    EXPECT_FALSE(io_->DoPreviews());
    EXPECT_TRUE(io_->GetAborting());
    EXPECT_FALSE(io_->OpenAVIFile(u"a.avi"));
    EXPECT_FALSE(io_->LoadFromFile(u"a.avi", /*check_unknown=*/false));
    EXPECT_EQ(-1, io_->InsertToFileTIFF(u"a.tif"));
    EXPECT_FALSE(io_->LoadFromFilePDF(u"a.pdf"));
    EXPECT_THROW(io_->SaveToFileZMN(u"a.zmn"), EZmException);
    EXPECT_THROW(io_->SaveToFile(folder_.Name("a.lyr"), 0), EZmException);
    EXPECT_FALSE(io_->LoadFromURL(u"file:///a.png"));
}

TEST_F(DriverSources, PluginsStandInForSvgAndPdf) {
    test::RegisterRow(kPluginSvgReaderType, "", ReadOneOfThree);
    test::RegisterRow(kPluginPdfWriteType, "", ReadOneOfThree);
    test::WriteFileBytes(folder_.File("a.svg"), {1});
    EXPECT_TRUE(io_->LoadFromFile(folder_.Name("a.svg"), std::int32_t{ioSVG}));
    EXPECT_EQ(kPluginSvgReaderType, io_->GetParams()->fFileType);
    io_->GetParams()->fDict.Insert(u"PDF:Password", u"secret");
    EXPECT_TRUE(io_->LoadFromFilePDF(folder_.Name("a.svg")));
    EXPECT_EQ(u"secret", io_->GetParams()->fDict.GetString(u"PDF:Password"));
}

TEST_F(DriverSources, NoticesOfALoadComeInOrder) {
    std::string order;
    const TBytes bytes = SavedAs(ioBMP);
    io_->SetOnImageLoaded([&](void*) { order += "loaded "; });
    io_->SetOnFinishWork([&](void*) { order += "finished "; });
    EXPECT_TRUE(LoadBytes(*io_, bytes, 0));
    EXPECT_FALSE(LoadBytes(*io_, TBytes(bytes.begin(), bytes.begin() + 60), ioBMP));
    EXPECT_EQ("loaded finished loaded finished ", order);
}

/// A module of the smallest kind: one section with one resource, type "PICS", name "SEA".
TBytes ModuleWith(const TBytes& data) {
    const auto bytes = static_cast<std::uint32_t>(data.size());
    // clang-format off
    return test::Joined(test::BytesWith(0x300, {
        {0x00, 0x5A4D}, {0x3C, 0x40}, {0x40, 0x4550},                // DOS header, PE header
        {0x44, 0x14C | 1 << 16}, {0x54, 0xE0 | 0x2102 << 16},        // i386, one section
        {0x58, 0x10B}, {0xB4, 16}, {0xC8, 0x1000}, {0xCC, 0x200},    // PE32, resources
        {0x138, 0x7273722E}, {0x13C, 'c'},                           // ".rsrc"
        {0x140, 0x1000}, {0x144, 0x1000}, {0x148, 0x1000}, {0x14C, 0x200},
        {0x20C, 1}, {0x210, 0x80000060}, {0x214, 0x80000018},        // one named type
        {0x224, 1}, {0x228, 0x80000070}, {0x22C, 0x80000030},        // one named resource
        {0x23C, 1 << 16}, {0x240, 0x409}, {0x244, 0x48},             // one language
        {0x248, 0x1100}, {0x24C, bytes},
        {0x260, 4 | 'P' << 16}, {0x264, 'I' | 'C' << 16}, {0x268, 'S'},
        {0x270, 3 | 'S' << 16}, {0x274, 'E' | 'A' << 16}}), data);
    // clang-format on
}

TEST_F(DriverSources, ResourcesOfModules) {
    test::WriteFileBytes(folder_.File("pics.dll"), ModuleWith(SavedAs(ioPNG)));
    TZalmoIO reader;
    EXPECT_TRUE(reader.LoadFromResource(folder_.Name("pics.dll"), u"pics", u"sea", 0));
    test::ExpectSamePixels(*image_, *reader.GetZmBitmap());
    EXPECT_FALSE(reader.GetParams()->fIsResource);
    TZmBitmap bitmap;
    EXPECT_TRUE(bitmap.LoadFromResource(folder_.Name("pics.dll"), u"pics", u"sea", 0));
    test::ExpectSamePixels(*image_, bitmap);
    EXPECT_FALSE(bitmap.LoadFromResource(folder_.Name("pics.dll"), u"pics", u"lake", 0));
    EXPECT_FALSE(reader.LoadFromResource(folder_.Name("pics.dll"), u"pics", u"lake", 0));
    EXPECT_FALSE(reader.LoadFromResource(folder_.Name("none.dll"), u"pics", u"sea", 0));
    EXPECT_TRUE(reader.GetAborting());
}

}  // namespace
}  // namespace zm
