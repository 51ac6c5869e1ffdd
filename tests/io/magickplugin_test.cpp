#include "engine/io/zmmagickplugin.h"

#include <gtest/gtest.h>

#include "engine/io/zmformatdetect.h"
#include "tests/io/driverfixture.h"

namespace zm {
namespace {

class MagickPlugin : public ::testing::Test {
protected:
    void TearDown() override { DestroySingletonInstance(); }
};

TEST_F(MagickPlugin, WithoutTheLibrariesNothingChanges) {
    const std::size_t rows = ZmGlobalSettings().fFileFormats.size();
    const bool is_registered = TZmMiscPluginsImageMagick::RegisterPlugin();
    EXPECT_EQ(TZmMiscPluginsImageMagick::IsAvailable(), is_registered);
    EXPECT_EQ(is_registered ? rows + 24 - 2 : rows, ZmGlobalSettings().fFileFormats.size());
}

TEST_F(MagickPlugin, TheRowsReplacePdfAndPostScript) {
    if (!TZmMiscPluginsImageMagick::RegisterPlugin()) {
        GTEST_SKIP() << "the ImageMagick libraries are not installed";
    }
    EXPECT_EQ(nullptr, FindFormatInfo(ioPDF));
    EXPECT_EQ(nullptr, FindFormatInfo(ioPS));
    EXPECT_EQ(8196, ExtensionToFileType(u".epdf"));
    EXPECT_EQ(8211, ExtensionToFileType(u".ps"));
    const TZmFileFormatInfo* row = FindFormatInfo(8204);
    ASSERT_NE(nullptr, row);
    EXPECT_EQ("MPEG Video Stream", row->FullName);
    EXPECT_EQ("M2V;MOV;MPEG;MPG", row->Extensions);
    EXPECT_FALSE(row->InternalFormat);
}

TEST_F(MagickPlugin, AnotherPdfPluginKeepsItsRow) {
    test::RegisterRow(kPluginPdfType, "");
    if (!TZmMiscPluginsImageMagick::RegisterPlugin()) {
        GTEST_SKIP() << "the ImageMagick libraries are not installed";
    }
    EXPECT_EQ(nullptr, FindFormatInfo(kPluginPdfWriteType));
}

TEST_F(MagickPlugin, ImagesGoOutAndComeBack) {
    if (!TZmMiscPluginsImageMagick::RegisterPlugin()) {
        GTEST_SKIP() << "the ImageMagick libraries are not installed";
    }
    constexpr std::int32_t kMiff = 8206;
    const auto image = test::MakeGradient(zm24RGB, 23, 11);
    const auto writer = TZalmoIO::CreateFromBitmap(image.get());
    TMemoryStream stream;
    ASSERT_TRUE(writer->SaveToStream(stream, kMiff));
    stream.SetPosition(0);
    EXPECT_EQ(kMiff, FindStreamFormat(stream));
    TZalmoIO reader;
    ASSERT_TRUE(reader.LoadFromStream(stream, 0));
    test::ExpectSamePixels(*image, *reader.GetZmBitmap());
    EXPECT_EQ(23, reader.GetParams()->fWidth);

    stream.SetPosition(0);
    TIOParams params;
    EXPECT_TRUE(params.Read(stream, kMiff));
    EXPECT_EQ(11, params.fHeight);
    EXPECT_EQ(1, params.GetImageCount());
    EXPECT_FALSE(reader.LoadFromBuffer("no image at all", 15, kMiff));
    const std::vector<std::uint8_t> cut(stream.Bytes().begin(), stream.Bytes().begin() + 40);
    EXPECT_FALSE(reader.LoadFromBuffer(cut.data(), 40, kMiff));
}

}  // namespace
}  // namespace zm
