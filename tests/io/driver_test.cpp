#include "engine/io/zalmoio.h"

#include <gtest/gtest.h>

#include <cstring>
#include <new>
#include <string>
#include <vector>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmfileformats.h"
#include "engine/io/zmformatdetect.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

constexpr std::int32_t kPluginType = 9000;

void WriteMark(TStream& stream, TZmBitmap&, TIOParams&, TProgressRec&) {
    stream.WriteBuffer("MARK", 4);
}

void WriteThenAbort(TStream& stream, TZmBitmap&, TIOParams&, TProgressRec& progress) {
    stream.WriteBuffer("MARK", 4);
    *progress.Aborting = true;
}

void WriteThenRaise(TStream& stream, TZmBitmap&, TIOParams&, TProgressRec&) {
    stream.WriteBuffer("MARK", 4);
    throw EZmException("writer broke");
}

void WriteWithoutMemory(TStream&, TZmBitmap&, TIOParams&, TProgressRec&) {
    throw std::bad_alloc();
}

void ReadOnePixel(TStream&, TZmBitmap& bitmap, TIOParams& params, TProgressRec& progress,
                  bool preview) {
    EXPECT_FALSE(preview);
    EXPECT_EQ(kPluginType, params.fFileType);
    *progress.Aborting = !bitmap.Allocate(1, 1, zm24RGB);
}

class Driver : public ::testing::Test {
protected:
    void SetUp() override {
        image_ = test::MakeGradient(zm24RGB, 12, 9);
        io_ = TZalmoIO::CreateFromBitmap(image_.get());
        io_->SetOnFinishWork([this](void*) { ++finish_count_; });
    }
    void TearDown() override { DestroySingletonInstance(); }

    static TZmFileFormatInfo& RegisterPlugin(TZmReadImageStream read, TZmWriteImageStream write) {
        auto row = std::make_shared<TZmFileFormatInfo>();
        row->FileType = kPluginType;
        row->Extensions = "PLUG";
        row->ReadFunction = read;
        row->WriteFunction = write;
        RegisterFileFormat(row);
        return *row;
    }

    std::int32_t TypeOf(const std::string& name) {
        return FindFileFormat(folder_.Name(name), zmfmContentOnly);
    }

    TBytes Bytes(const std::string& name) { return test::ReadFileBytes(folder_.File(name)); }

    test::TempFolder folder_;
    std::unique_ptr<TZmBitmap> image_;
    std::unique_ptr<TZalmoIO> io_;
    int finish_count_ = 0;
};

TEST_F(Driver, LosslessFormatsComeBackAsTheyWere) {
    for (const std::int32_t type : {ioBMP, ioPNG}) {
        const std::u16string name = folder_.Name("photo.dat");
        EXPECT_TRUE(io_->SaveToFile(name, type));
        EXPECT_EQ(type, TypeOf("photo.dat"));
        TZalmoIO reader;
        EXPECT_TRUE(reader.LoadFromFile(name, 0));
        EXPECT_EQ(type, reader.GetParams()->fFileType);
        EXPECT_EQ(name, reader.GetParams()->fFileName);
        EXPECT_EQ(300, reader.GetParams()->GetDpiX());
        test::ExpectSamePixels(*image_, *reader.GetZmBitmap());
    }
    EXPECT_EQ(2, finish_count_);
}

TEST_F(Driver, ContentDecidesWhereTheNameTellsNothing) {
    const std::u16string name = folder_.Name("photo.unknown");
    ASSERT_TRUE(io_->SaveToFileJpeg(name));
    finish_count_ = 0;
    EXPECT_FALSE(io_->LoadFromFile(name, false));
    EXPECT_TRUE(io_->GetAborting());
    EXPECT_EQ(1, finish_count_);
    EXPECT_TRUE(io_->LoadFromFile(name, true));
    EXPECT_EQ(ioJPEG, io_->GetParams()->fFileType);
    EXPECT_TRUE(io_->LoadFromFileAuto(name));
    EXPECT_FALSE(io_->LoadFromFileFormat(name, 0));
}

TEST_F(Driver, ContentDecidesWhereTheNameIsWrong) {
    const std::u16string name = folder_.Name("photo.png");
    ASSERT_TRUE(io_->SaveToFileBMP(name));
    EXPECT_FALSE(io_->LoadFromFile(name, false));
    EXPECT_TRUE(io_->LoadFromFile(name, true));
    EXPECT_EQ(ioBMP, io_->GetParams()->fFileType);
}

TEST_F(Driver, TheTypeOfASaveComesFromTheNameThenTheParametersThenJpeg) {
    EXPECT_TRUE(io_->SaveToFile(folder_.Name("a.bmp"), 0));
    EXPECT_EQ(ioBMP, TypeOf("a.bmp"));
    EXPECT_TRUE(io_->SaveToFile(folder_.Name("b"), 0));
    EXPECT_EQ(ioBMP, TypeOf("b"));
    io_->GetParams()->fFileType = 0;
    EXPECT_TRUE(io_->SaveToFile(folder_.Name("c"), 0));
    EXPECT_EQ(ioJPEG, TypeOf("c"));
    EXPECT_TRUE(io_->SaveToFile(folder_.Name("d.jpg"), ioPNG));
    EXPECT_EQ(ioPNG, TypeOf("d.jpg"));

    TZalmoIO fresh;
    fresh.GetZmBitmap()->Assign(image_.get());
    TMemoryStream stream;
    EXPECT_TRUE(fresh.SaveToStream(stream, 0));
    stream.SetPosition(0);
    EXPECT_EQ(ioJPEG, FindStreamFormat(stream));
}

TEST_F(Driver, TypesWithoutCodecFail) {
    for (const std::int32_t type : {ioHEIF, ioRAW, ioOtherWIC, 12345}) {
        EXPECT_FALSE(io_->SaveToFile(folder_.Name("x.dat"), type)) << type;
        TMemoryStream stream(TBytes(64));
        EXPECT_FALSE(io_->SaveToStream(stream, type)) << type;
        EXPECT_FALSE(io_->LoadFromStream(stream, type)) << type;
        EXPECT_TRUE(io_->GetAborting()) << type;
    }
    EXPECT_TRUE(test::ListFolder(folder_.Path()).empty());
}

TEST_F(Driver, EmptyArguments) {
    EXPECT_FALSE(io_->LoadFromFile(u"", ioPNG));
    EXPECT_EQ(1, finish_count_);
    EXPECT_FALSE(io_->LoadFromBuffer(nullptr, 10, ioPNG));
    EXPECT_FALSE(io_->LoadFromBuffer("x", 0, ioPNG));
    TMemoryStream empty;
    EXPECT_FALSE(io_->LoadFromStream(empty, 0));
    EXPECT_EQ(2, finish_count_);
    io_->AttachZmBitmap(nullptr);
    EXPECT_FALSE(io_->LoadFromFile(folder_.Name("a.png"), ioPNG));
    EXPECT_THROW(io_->SaveToStream(empty, ioPNG), EZmException);
    EXPECT_THROW(io_->LoadFromStreamPNG(empty), EZmException);
}

TEST_F(Driver, FilesThatCannotBeOpenedOrCreatedRaise) {
    EXPECT_THROW(io_->LoadFromFile(folder_.Name("missing.png"), ioPNG), EFOpenError);
    EXPECT_TRUE(io_->GetAborting());
    io_->SetAborting(false);
    EXPECT_THROW(io_->SaveToFile(folder_.Name("missing/a.png"), ioPNG), EFCreateError);
    EXPECT_TRUE(io_->GetAborting());
}

TEST_F(Driver, AnEmptyImageReplacesNothing) {
    TZalmoIO fresh;
    test::WriteFileBytes(folder_.File("a.jpg"), {1, 2, 3});
    EXPECT_FALSE(fresh.SaveToFile(folder_.Name("a.jpg"), ioJPEG));
    EXPECT_EQ((TBytes{1, 2, 3}), Bytes("a.jpg"));
}

TEST_F(Driver, AFailedSaveKeepsTheOldFileAndLeavesNothingBehind) {
    TZmFileFormatInfo& row = RegisterPlugin(nullptr, WriteThenAbort);
    test::WriteFileBytes(folder_.File("a.plug"), {1, 2, 3});
    const std::u16string name = folder_.Name("a.plug");
    EXPECT_FALSE(io_->SaveToFile(name, kPluginType));
    row.WriteFunction = WriteThenRaise;
    EXPECT_THROW(io_->SaveToFile(name, kPluginType), EZmException);
    EXPECT_TRUE(io_->GetAborting());
    row.WriteFunction = WriteWithoutMemory;
    EXPECT_FALSE(io_->SaveToFile(name, kPluginType));
    EXPECT_EQ(3, finish_count_);
    EXPECT_EQ((TBytes{1, 2, 3}), Bytes("a.plug"));
    EXPECT_EQ((std::vector<std::string>{"a.plug"}), test::ListFolder(folder_.Path()));
    row.WriteFunction = WriteMark;
    EXPECT_TRUE(io_->SaveToFile(name, kPluginType));
    EXPECT_EQ((TBytes{'M', 'A', 'R', 'K'}), Bytes("a.plug"));
}

TEST_F(Driver, OneFileCanBeInputAndOutput) {
    const std::u16string name = folder_.Name("same.png");
    ASSERT_TRUE(io_->SaveToFile(name, ioPNG));
    TZmBitmap bitmap;
    ASSERT_TRUE(bitmap.Read(name, nullptr, true));
    ASSERT_TRUE(bitmap.Crop(0, 0, 4, 4, kCropNoFill));
    EXPECT_TRUE(bitmap.Write(name, ioPNG, nullptr));
    TZmBitmap again;
    ASSERT_TRUE(again.Read(name, nullptr, true));
    test::ExpectSamePixels(bitmap, again);
    EXPECT_EQ((std::vector<std::string>{"same.png"}), test::ListFolder(folder_.Path()));
}

TEST_F(Driver, ASaveLeavesTheBitmapAsItWas) {
    for (const TZmPixelFormat format :
         {zm1g, zm8p, zm8g, zm16g, zm24RGB, zm32f, zmCMYK, zm48RGB, zmCIELab, zm32RGB}) {
        const auto original = test::MakeGradient(format, 17, 6);
        test::AddNoiseAlpha(*original, 5);
        TZmBitmap bitmap(*original);
        const auto driver = TZalmoIO::CreateFromBitmap(&bitmap);
        for (const std::int32_t type : {ioBMP, ioPNG, ioJPEG}) {
            TMemoryStream stream;
            driver->GetParams()->SetDefaultParams();
            EXPECT_TRUE(driver->SaveToStream(stream, type)) << format << " as " << type;
            test::ExpectSamePixels(*original, bitmap);
            test::ExpectSameAlpha(*original, bitmap);
        }
    }
}

TEST_F(Driver, AlphaTravelsThroughPngAndThroughBmpWhereAsked) {
    test::AddNoiseAlpha(*image_, 3);
    for (const std::int32_t type : {ioPNG, ioBMP}) {
        TMemoryStream stream;
        io_->GetParams()->fBMP_HandleTransparency = true;
        ASSERT_TRUE(io_->SaveToStream(stream, type));
        stream.SetPosition(0);
        TZalmoIO reader;
        reader.GetParams()->fBMP_HandleTransparency = true;
        ASSERT_TRUE(reader.LoadFromStream(stream, type));
        test::ExpectSamePixels(*image_, *reader.GetZmBitmap());
        test::ExpectSameAlpha(*image_, *reader.GetZmBitmap());
        // A load drops what was there before.
        TMemoryStream opaque;
        ASSERT_TRUE(TZalmoIO::CreateFromBitmap(test::MakeGradient(zm24RGB, 3, 3).get())
                        ->SaveToStream(opaque, type));
        opaque.SetPosition(0);
        ASSERT_TRUE(reader.LoadFromStream(opaque, type));
        EXPECT_FALSE(reader.GetZmBitmap()->HasAlphaChannel());
    }
}

TEST_F(Driver, ThePngBackgroundIsTheDriversOwn) {
    io_->SetBackground(0x0000FF);  // red
    io_->GetParams()->fPNG_Background = TRGB{255, 255, 255};
    TMemoryStream stream;
    ASSERT_TRUE(io_->SaveToStreamPNG(stream));
    EXPECT_EQ((TRGB{0, 0, 255}), io_->GetParams()->fPNG_Background);
    stream.SetPosition(0);
    TZalmoIO reader;
    ASSERT_TRUE(reader.LoadFromStreamPNG(stream));
    EXPECT_EQ(0x0000FF, reader.GetBackground());
}

TEST_F(Driver, LowResolutionsBecomeTheSettings) {
    ZmGlobalSettings().fDefaultDPIX = 123;
    RegisterPlugin(ReadOnePixel, nullptr);
    io_->GetParams()->SetDpiX(1);
    io_->GetParams()->SetDpiY(2);
    TMemoryStream stream;
    ASSERT_TRUE(io_->SaveToStreamBMP(stream));
    stream.SetPosition(0);
    ASSERT_TRUE(io_->LoadFromStreamBMP(stream));
    EXPECT_EQ(123, io_->GetParams()->GetDpiX());
    EXPECT_EQ(2, io_->GetParams()->GetDpiY());
}

TEST_F(Driver, PluginRowsAreCalled) {
    RegisterPlugin(ReadOnePixel, nullptr);
    TMemoryStream stream(TBytes(4));
    EXPECT_TRUE(io_->LoadFromStream(stream, kPluginType));
    EXPECT_EQ(1, image_->GetWidth());
    test::WriteFileBytes(folder_.File("a.plug"), {1});
    EXPECT_TRUE(io_->LoadFromFile(folder_.Name("a.plug"), false));
    EXPECT_EQ(folder_.Name("a.plug"), io_->GetParams()->fFileName);
    EXPECT_FALSE(io_->SaveToStream(stream, kPluginType));  // the row cannot write
}

TEST_F(Driver, RaisingAndMemorylessReadersRunTheFinishNotice) {
    TZmFileFormatInfo& row = RegisterPlugin(
        [](TStream&, TZmBitmap&, TIOParams&, TProgressRec&, bool) { throw std::bad_alloc(); },
        nullptr);
    TMemoryStream stream(TBytes(4));
    EXPECT_FALSE(io_->LoadFromStream(stream, kPluginType));
    EXPECT_EQ(1, finish_count_);
    row.ReadFunction = [](TStream&, TZmBitmap&, TIOParams&, TProgressRec&, bool) {
        throw EReadError("reader broke");
    };
    EXPECT_THROW(io_->LoadFromStream(stream, kPluginType), EReadError);
    EXPECT_TRUE(io_->GetAborting());
    EXPECT_EQ(2, finish_count_);
}

TEST_F(Driver, AFailedLoadTellsSoAndKeepsTheType) {
    TMemoryStream stream;
    ASSERT_TRUE(io_->SaveToStreamPNG(stream));
    const TBytes whole = stream.Bytes();
    const TBytes cut(whole.begin(), whole.begin() + 40);
    TZalmoIO reader;
    EXPECT_FALSE(reader.LoadFromBuffer(cut.data(), static_cast<std::int64_t>(cut.size()), 0));
    EXPECT_EQ(0, reader.GetParams()->fFileType);
    EXPECT_TRUE(reader.LoadFromBuffer(whole.data(), static_cast<std::int64_t>(whole.size()), 0));
    EXPECT_FALSE(reader.GetAborting());
}

TEST_F(Driver, TheProgressEventSeesTheEndAndCanStopTheWork) {
    std::vector<std::int32_t> percents;
    io_->SetOnProgress([&](void* sender, std::int32_t percent) {
        EXPECT_EQ(io_.get(), sender);
        percents.push_back(percent);
    });
    TMemoryStream stream;
    ASSERT_TRUE(io_->SaveToStreamBMP(stream));
    ASSERT_GT(percents.size(), 5u);
    EXPECT_EQ(100, percents.back());
    io_->SetOnProgress([this](void*, std::int32_t) { io_->SetAborting(true); });
    stream.SetPosition(0);
    EXPECT_FALSE(io_->LoadFromStreamBMP(stream));
}

TEST_F(Driver, APlatformBitmapIsLoadedInPlace) {
    TMemoryStream stream;
    ASSERT_TRUE(io_->SaveToStreamBMP(stream));
    stream.SetPosition(0);
    TBitmap target;
    const auto driver = TZalmoIO::CreateFromBitmap(&target);
    ASSERT_TRUE(driver->LoadFromStreamBMP(stream));
    EXPECT_EQ(12, target.GetWidth());
    EXPECT_EQ(9, target.GetHeight());
    EXPECT_TRUE(target.GetModified());
    EXPECT_EQ(0, std::memcmp(image_->GetScanLine(8), target.GetScanLine(8), 36));
}

TEST_F(Driver, BitmapsReadAndWriteWithParametersOfTheirOwnOrGivenOnes) {
    const std::u16string name = folder_.Name("a.png");
    TIOParams given;
    given.SetDpiX(200);
    given.fPNG_TextKeys = {"Title"};
    given.fPNG_TextValues = {"Sea"};
    ASSERT_TRUE(image_->Write(name, &given));

    TZmBitmap bitmap;
    bitmap.SetParamsEnabled(true);
    TIOParams told;
    ASSERT_TRUE(bitmap.Read(name, &told, true));
    EXPECT_EQ(name, bitmap.GetFilename());
    EXPECT_EQ(ioPNG, bitmap.GetFileType());
    EXPECT_EQ(200, told.GetDpiX());
    EXPECT_EQ("Sea", bitmap.GetParams()->fPNG_TextValues.at(0));

    // Nil parameters: the bitmap's own go out, with depth and channels of its format.
    bitmap.GetParams()->fBitsPerSample = 1;
    bitmap.GetParams()->fSamplesPerPixel = 1;
    const std::u16string second = folder_.Name("b.png");
    ASSERT_TRUE(bitmap.Write(second, ioPNG, nullptr));
    EXPECT_EQ(8, bitmap.GetParams()->fBitsPerSample);
    EXPECT_EQ(3, bitmap.GetParams()->fSamplesPerPixel);
    TIOParams second_told;
    ASSERT_TRUE(TZmBitmap().Read(second, &second_told, true));
    EXPECT_EQ("Sea", second_told.fPNG_TextValues.at(0));

    // Given parameters replace the bitmap's own for good.
    TIOParams fresh;
    ASSERT_TRUE(bitmap.Write(second, ioPNG, &fresh));
    EXPECT_TRUE(bitmap.GetParams()->fPNG_TextKeys.empty());
    EXPECT_EQ(300, bitmap.GetParams()->GetDpiX());
}

TEST_F(Driver, BitmapsReadStreamsAndBuffers) {
    TMemoryStream stream;
    ASSERT_TRUE(image_->Write(&stream, ioPNG, nullptr));
    stream.SetPosition(0);
    TZmBitmap from_stream;
    EXPECT_TRUE(from_stream.Read(&stream, 0, nullptr));
    test::ExpectSamePixels(*image_, from_stream);
    TZmBitmap from_buffer;
    EXPECT_TRUE(from_buffer.Read(stream.Bytes().data(), stream.GetSize(), ioPNG, nullptr));
    test::ExpectSamePixels(*image_, from_buffer);
    EXPECT_FALSE(from_buffer.Read(nullptr, 0, ioPNG, nullptr));
}

}  // namespace
}  // namespace zm
