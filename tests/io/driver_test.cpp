#include <cstring>
#include <new>
#include <vector>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/io/zmformatdetect.h"
#include "tests/io/driverfixture.h"

namespace zm {
namespace {

using test::TBytes;

constexpr std::int32_t kPluginType = 9000;

void ReadOnePixel(TStream&, TZmBitmap& bitmap, TIOParams& params, TProgressRec& progress,
                  bool preview) {
    EXPECT_FALSE(preview);
    EXPECT_EQ(kPluginType, params.fFileType);
    *progress.Aborting = !bitmap.Allocate(1, 1, zm24RGB);
}

class Driver : public test::DriverFixture {
protected:
    static TZmFileFormatInfo& RegisterPlugin(TZmReadImageStream read, TZmWriteImageStream write) {
        return test::RegisterRow(kPluginType, "PLUG", read, write);
    }
    std::int32_t TypeOf(const std::string& name) {
        return FindFileFormat(folder_.Name(name), zmfmContentOnly);
    }
    TBytes Bytes(const std::string& name) { return test::ReadFileBytes(folder_.File(name)); }
};

TEST_F(Driver, ContentDecidesWhereTheNameTellsNothingOrIsWrong) {
    for (const char* file : {"photo.unknown", "photo.bmp"}) {
        const std::u16string name = folder_.Name(file);
        ASSERT_TRUE(io_->SaveToFileJpeg(name));
        finish_count_ = 0;
        EXPECT_FALSE(io_->LoadFromFile(name, false));
        EXPECT_TRUE(io_->GetAborting());
        EXPECT_EQ(1, finish_count_);
        EXPECT_TRUE(io_->LoadFromFile(name, true));
        EXPECT_EQ(ioJPEG, io_->GetParams()->fFileType);
        EXPECT_EQ(name, io_->GetParams()->fFileName);
        EXPECT_TRUE(io_->LoadFromFileAuto(name));
        EXPECT_FALSE(io_->LoadFromFileFormat(name, 0));
    }
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
    // Types that the settings give away are saved as what their name says without that.
    ZmGlobalSettings().fWICFileTypes = "*.bmp;*.xyz";
    EXPECT_TRUE(io_->SaveToFile(folder_.Name("e.bmp"), 0));
    EXPECT_EQ(ioBMP, TypeOf("e.bmp"));
    EXPECT_FALSE(io_->SaveToFile(folder_.Name("e.xyz"), 0));

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

TEST_F(Driver, AFailedSaveKeepsTheOldFileAndLeavesNothingBehind) {
    TZmFileFormatInfo& row =
        RegisterPlugin(nullptr, [](TStream& stream, TZmBitmap&, TIOParams&, TProgressRec& record) {
            stream.WriteBuffer("MARK", 4);
            *record.Aborting = true;
        });
    test::WriteFileBytes(folder_.File("a.plug"), {1, 2, 3});
    const std::u16string name = folder_.Name("a.plug");
    EXPECT_FALSE(io_->SaveToFile(name, kPluginType));
    row.WriteFunction = [](TStream& stream, TZmBitmap&, TIOParams&, TProgressRec&) {
        stream.WriteBuffer("MARK", 4);
        throw EZmException("writer broke");
    };
    EXPECT_THROW(io_->SaveToFile(name, kPluginType), EZmException);
    EXPECT_TRUE(io_->GetAborting());
    row.WriteFunction = [](TStream&, TZmBitmap&, TIOParams&, TProgressRec&) {
        throw std::bad_alloc();
    };
    EXPECT_FALSE(io_->SaveToFile(name, kPluginType));
    EXPECT_EQ(3, finish_count_);
    EXPECT_EQ((TBytes{1, 2, 3}), Bytes("a.plug"));
    EXPECT_EQ((std::vector<std::string>{"a.plug"}), test::ListFolder(folder_.Path()));
    row.WriteFunction = [](TStream& stream, TZmBitmap&, TIOParams&, TProgressRec&) {
        stream.WriteBuffer("MARK", 4);
    };
    EXPECT_TRUE(io_->SaveToFile(name, kPluginType));
    EXPECT_EQ((TBytes{'M', 'A', 'R', 'K'}), Bytes("a.plug"));

    TZmBitmap empty;
    EXPECT_FALSE(TZalmoIO::CreateFromBitmap(&empty)->SaveToFile(name, ioJPEG));
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
    const TBytes opaque = SavedAs(ioPNG);
    test::AddNoiseAlpha(*image_, 3);
    for (const std::int32_t type : {ioPNG, ioBMP}) {
        io_->GetParams()->fBMP_HandleTransparency = true;
        TZalmoIO reader;
        reader.GetParams()->fBMP_HandleTransparency = true;
        ASSERT_TRUE(LoadBytes(reader, SavedAs(type), type));
        test::ExpectSamePixels(*image_, *reader.GetZmBitmap());
        test::ExpectSameAlpha(*image_, *reader.GetZmBitmap());
        // A load drops what was there before.
        ASSERT_TRUE(LoadBytes(reader, opaque, ioPNG));
        EXPECT_FALSE(reader.GetZmBitmap()->HasAlphaChannel());
    }
}

TEST_F(Driver, ThePngBackgroundIsTheDriversOwn) {
    io_->SetBackground(0x0000FF);  // red
    io_->GetParams()->fPNG_Background = TRGB{255, 255, 255};
    const TBytes png = SavedAs(ioPNG);
    EXPECT_EQ((TRGB{0, 0, 255}), io_->GetParams()->fPNG_Background);
    TZalmoIO reader;
    ASSERT_TRUE(LoadBytes(reader, png, ioPNG));
    EXPECT_EQ(0x0000FF, reader.GetBackground());
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
    const TBytes whole = SavedAs(ioPNG);
    TZalmoIO reader;
    EXPECT_FALSE(LoadBytes(reader, TBytes(whole.begin(), whole.begin() + 40), 0));
    EXPECT_EQ(0, reader.GetParams()->fFileType);
    EXPECT_TRUE(LoadBytes(reader, whole, 0));
    EXPECT_FALSE(reader.GetAborting());
}

TEST_F(Driver, APlatformBitmapIsLoadedInPlace) {
    TBitmap target;
    const auto driver = TZalmoIO::CreateFromBitmap(&target);
    ASSERT_TRUE(LoadBytes(*driver, SavedAs(ioBMP), ioBMP));
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
