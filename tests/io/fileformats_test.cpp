#include "engine/io/zmfileformats.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/io/driverfixture.h"

namespace zm {
namespace {

/// Leaves the settings, and with them the registry, as the process made them.
class FileFormats : public ::testing::Test {
protected:
    void TearDown() override { DestroySingletonInstance(); }
};

TEST_F(FileFormats, RowsStandInTheirOrderWithTheirAbilities) {
    // Type, read and write, page as a bit set.
    struct TRow {
        std::int32_t type;
        const char* use;
        std::uint32_t page_bits;
    };
    const std::vector<TRow> expected{
        {1, "RW", 1u << 3},  {2, "RW", 1u << 4}, {3, "RW", 1u << 2}, {4, "RW", 1u << 6},
        {5, "RW", 1u << 5},  {21, "RW", 0},      {6, "RW", 0},       {7, "R", 0},
        {8, "RW", 1u << 7},  {28, "RW", 0},      {9, "R", 0},        {10, "R", 0},
        {11, "RW", 1u << 8}, {12, "RW", 0},      {16, "RW", 0},      {13, "RW", 1u << 9},
        {14, "RW", 1u << 9}, {17, "W", 0},       {18, "W", 0},       {19, "RW", 0},
        {20, "R", 0},        {24, "RW", 0},      {25, "RW", 0},      {27, "RW", 0},
        {26, "RW", 0},       {31, "W", 0}};
    const auto& rows = ZmGlobalSettings().fFileFormats;
    ASSERT_EQ(expected.size(), rows.size());
    for (std::size_t i = 0; i < rows.size(); ++i) {
        const TZmFileFormatInfo& row = *rows[i];
        const std::string use = std::string(row.ReadFunction != nullptr ? "R" : "") +
                                (row.WriteFunction != nullptr ? "W" : "");
        EXPECT_EQ(expected[i].type, row.FileType) << i;
        EXPECT_EQ(expected[i].use, use) << row.FullName;
        EXPECT_EQ(expected[i].page_bits, row.DialogPage.Bits()) << row.FullName;
        EXPECT_TRUE(row.InternalFormat) << row.FullName;
    }
}

TEST_F(FileFormats, FindsRowsByExtension) {
    struct TCase {
        std::u16string extension;
        std::int32_t type;
    };
    const std::vector<TCase> cases{{u".JPG", ioJPEG}, {u"jpe", ioJPEG},   {u".xif", ioTIFF},
                                   {u".pix", ioTGA},  {u".win", 0},       {u".Dib", ioBMP},
                                   {u".v2", ioDICOM}, {u".zalmo", ioLYR}, {u".srw", ioRAW},
                                   {u".3fr", ioRAW},  {u"", 0},           {u".", 0},
                                   {u"..jpg", 0},     {u".mpeg", ioMPEG}, {u".wmv", ioWMV},
                                   {u".avi", 0},      {u".wdp", 0},       {u".\u0130", 0}};
    for (const TCase& c : cases) {
        EXPECT_EQ(c.type, ExtensionToFileType(c.extension)) << ::testing::PrintToString(c.type);
    }
    EXPECT_EQ(ioPNG, FileNameToFileType(u"/a.b/photo.old.PNG"));
    EXPECT_EQ(0, FileNameToFileType(u"/a.png/photo"));
    EXPECT_EQ(nullptr, FindFormatInfo(0));
    EXPECT_EQ(nullptr, FindFormatInfo(30));
}

TEST_F(FileFormats, TheFirstRowWinsATie) {
    test::RegisterRow(9000, "NEW;PNG");
    test::RegisterRow(9001, "NEW");
    EXPECT_EQ(ioPNG, ExtensionToFileType(u".png"));
    EXPECT_EQ(9000, ExtensionToFileType(u".new"));
    UnregisterFileFormat(9000);
    EXPECT_EQ(9001, ExtensionToFileType(u".new"));
    const std::size_t count = ZmGlobalSettings().fFileFormats.size();
    UnregisterFileFormat(9000);
    EXPECT_EQ(count, ZmGlobalSettings().fFileFormats.size());
}

TEST_F(FileFormats, ListedPlatformTypesComeBeforeAllRows) {
    ZmGlobalSettings().fWICFileTypes = "*.png;*.Foo";
    EXPECT_EQ(nullptr, FindFormatInfoByExtension(u".png"));  // the row itself is absent
    test::RegisterRow(ioOtherWIC, "");
    EXPECT_EQ(ioOtherWIC, ExtensionToFileType(u".png"));
    EXPECT_EQ(ioOtherWIC, ExtensionToFileType(u"FOO"));
    EXPECT_EQ(ioJPEG, ExtensionToFileType(u".jpg"));
    EXPECT_EQ(2, FileFormatExtensionCount(ioOtherWIC));
    EXPECT_EQ("FOO", FileFormatExtension(ioOtherWIC, 1));
    const TZmFileFormatInfo& row = *FindFormatInfo(ioOtherWIC);
    ZmGlobalSettings().fWICFileTypes = "*.Bar";
    EXPECT_EQ("bar", FileFormatDefaultExtension(row));
    ZmGlobalSettings().fWICFileTypes = "";
    EXPECT_EQ(0, FileFormatExtensionCount(ioOtherWIC));
    EXPECT_EQ(ioPNG, ExtensionToFileType(u".png"));
}

TEST_F(FileFormats, SplitsExtensions) {
    EXPECT_EQ(5, FileFormatExtensionCount(ioJPEG));
    EXPECT_EQ("JFIF", FileFormatExtension(ioJPEG, 4));
    EXPECT_EQ("", FileFormatExtension(ioJPEG, 5));
    EXPECT_EQ("", FileFormatExtension(ioJPEG, -1));
    EXPECT_EQ(0, FileFormatExtensionCount(ioBMPRAW));
    EXPECT_EQ(36, FileFormatExtensionCount(ioRAW));
    EXPECT_EQ("CRW", FileFormatExtension(ioRAW, 0));
    EXPECT_EQ("jpeg", FileFormatDefaultExtension(*FindFormatInfo(ioJPEG)));
    EXPECT_EQ("gif", FileFormatDefaultExtension(*FindFormatInfo(ioGIF)));
}

TEST_F(FileFormats, TheGifRowFollowsItsCoders) {
    RefreshGIFFormatRow();
    EXPECT_EQ(nullptr, FindFormatInfo(ioGIF)->ReadFunction);
    EXPECT_EQ(nullptr, FindFormatInfo(ioGIF)->WriteFunction);
    ZmGlobalSettings().fDefGIF_LZWDECOMPFUNC = [](TZmGIFLZWDecodeCall&) {};
    RefreshGIFFormatRow();
    EXPECT_NE(nullptr, FindFormatInfo(ioGIF)->ReadFunction);
    EXPECT_EQ(nullptr, FindFormatInfo(ioGIF)->WriteFunction);
}

TEST_F(FileFormats, SavesByAChainOfItsOwn) {
    struct TCase {
        std::u16string name;
        std::int32_t type;
    };
    const std::vector<TCase> cases{
        {u"a.jif", ioJPEG}, {u"a.WIN", ioTGA},   {u"a.pix", 0},       {u"a.xif", 0},
        {u"a.g3n", ioTIFF}, {u"a.heic", ioHEIF}, {u"a.webp", ioWEBP}, {u"a.wdp", ioHDP},
        {u"a.epdf", ioPDF}, {u"a.eps", ioPS},    {u"a.nef", ioRAW},   {u"a.zmn", ioLYR},
        {u"a.avi", 0},      {u"a", 0},           {u"dir.png/a", 0},   {u"a.svg", ioSVG}};
    for (const TCase& c : cases) {
        EXPECT_EQ(c.type, SaveExtensionToFileType(c.name)) << c.type;
    }
    EXPECT_EQ(ioAVI, SaveExtensionToFileType(u"a.avi", /*allow_video=*/true));
    UnregisterFileFormat(ioPDF);
    EXPECT_EQ(8222, SaveExtensionToFileType(u"a.pdf"));
    ZmGlobalSettings().fWICFileTypes = "*.jpg";
    EXPECT_EQ(ioOtherWIC, SaveExtensionToFileType(u"a.JPG"));
    ZmGlobalSettings().fWICFileTypes = "-";
    EXPECT_EQ(ioJPEG, SaveExtensionToFileType(u"a.JPG"));
}

TEST_F(FileFormats, NamesTypes) {
    EXPECT_STREQ("JPEG 2000", FileTypeName(ioJP2));
    EXPECT_STREQ("PDF", FileTypeName(ioPDF));
    EXPECT_STREQ("Unknown", FileTypeName(19));
    EXPECT_STREQ("Unknown", FileTypeName(-1));
}

}  // namespace
}  // namespace zm
