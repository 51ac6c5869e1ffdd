// What the steps do to a job's image, by files that go in and come out.
#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "actions/uActionContext.h"
#include "actions/uImageList.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfiletypes.h"
#include "engine/io/zmioparams.h"
#include "engine/platform/clipboard.h"
#include "engine/platform/files.h"
#include "plugin/AFPlugin_p.h"
#include "tests/plugin/testhost.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr TRGB kWhite{255, 255, 255};

class ActionsTest : public testing::Test {
protected:
    ~ActionsTest() override { plugin.caller->JobStop(gaOpenImage, 1); }

    bool Exec(std::int32_t action, const std::u16string& text, std::uint32_t task = 1) {
        return plugin.caller->Exec(action, text, task);
    }
    /// Makes a picture file and opens it as the job's image.
    std::unique_ptr<TZmBitmap> Open(TZmPixelFormat format, std::int32_t width, std::int32_t height,
                                    std::uint32_t task = 1) {
        auto picture = MakeGradient(format, width, height);
        const std::u16string name = folder.Name("open" + std::to_string(task) + ".bmp");
        EXPECT_TRUE(picture->Write(name, ioBMP, nullptr));
        EXPECT_TRUE(Exec(gaOpenImage, u"image_file=" + name, task));
        return picture;
    }
    /// The job's image as it stands, by way of a lossless file.
    std::unique_ptr<TZmBitmap> Image(std::uint32_t task = 1) {
        const std::u16string name = folder.Name("state.bmp");
        EXPECT_TRUE(Exec(gaSaveImage, u"format=3\r\nimage_file=" + name, task));
        auto image = std::make_unique<TZmBitmap>();
        EXPECT_TRUE(image->Read(name, nullptr, true));
        return image;
    }
    void ExpectSize(std::int32_t width, std::int32_t height, const std::u16string& because) {
        auto image = Image();
        EXPECT_EQ(image->GetWidth(), width) << Utf8FromUtf16(because);
        EXPECT_EQ(image->GetHeight(), height) << Utf8FromUtf16(because);
    }
    /// The job's image is `picture` with this place of its own at 0, 0; `fill` lies around it.
    void ExpectWindow(TZmBitmap& picture, const TRect& window, TRGB fill,
                      const std::u16string& because) {
        auto image = Image();
        ASSERT_EQ(image->GetWidth(), window.right - window.left) << Utf8FromUtf16(because);
        ASSERT_EQ(image->GetHeight(), window.bottom - window.top) << Utf8FromUtf16(because);
        for (std::int32_t y = window.top; y < window.bottom; ++y) {
            for (std::int32_t x = window.left; x < window.right; ++x) {
                const bool inside =
                    x >= 0 && x < picture.GetWidth() && y >= 0 && y < picture.GetHeight();
                ASSERT_EQ(image->GetPixels(x - window.left, y - window.top),
                          inside ? picture.GetPixels(x, y) : fill)
                    << x << ", " << y << " of " << Utf8FromUtf16(because);
            }
        }
    }
    /// One error was reported, once whole and once as a log line.
    void ExpectReported(std::int32_t code, const std::u16string& text, std::int32_t job = 1) {
        EXPECT_EQ(plugin.host.Errors(), (std::vector<THostError>{{job, code, text}}));
        EXPECT_EQ(plugin.host.Lines(), (std::vector<THostLine>{{2, text}}));
        plugin.host.ForgetReports();
    }
    void ExpectNothingReported() {
        EXPECT_TRUE(plugin.host.Errors().empty());
        EXPECT_TRUE(plugin.host.Lines().empty());
    }

    TLinkedPlugin plugin;
    TempFolder folder;
};

TEST_F(ActionsTest, WithoutAnImageEveryOperationReportsCode1) {
    for (std::int32_t action = gaSaveImage; action <= gaAddBorder; ++action) {
        EXPECT_FALSE(Exec(action, u"image_w=5\r\nimage_h=5\r\nr=4\r\nb=4", 77));
        ExpectReported(1, u"There is no opened image. Use the Open Image action first.", 77);
    }
    plugin.caller->JobStop(gaOpenImage, 77);
    ExpectNothingReported();
}

TEST_F(ActionsTest, OpenReportsWhatFailedAndKeepsTheEarlierImage) {
    auto picture = Open(zm24RGB, 7, 5);
    const std::u16string missing = folder.Name("missing.png");
    EXPECT_FALSE(Exec(gaOpenImage, u"image_file=" + missing));
    ExpectReported(3, u"File \"" + missing + u"\" not exists");
    EXPECT_FALSE(Exec(gaOpenImage, u""));
    ExpectReported(3, u"File \"\" not exists");
    EXPECT_FALSE(Exec(gaOpenImage, u"image_file=" + EngineName(folder.Path())));
    ExpectReported(3, u"File \"" + EngineName(folder.Path()) + u"\" not exists");

    for (const std::string bytes : {"", "BM", "\x89PNG\r\n", "no image at all"}) {
        WriteFileBytes(folder.File("broken.png"), {bytes.begin(), bytes.end()});
        const std::u16string broken = folder.Name("broken.png");
        EXPECT_FALSE(Exec(gaOpenImage, u"image_file=" + broken));
        ExpectReported(4, u"Cannot read image file \"" + broken + u"\"");
    }
    ASSERT_TRUE(platform::TClipboard::Open()->Empty());
    EXPECT_FALSE(Exec(gaOpenImage, u"source=1\r\nimage_file=" + folder.Name("open1.bmp")));
    ExpectReported(4, u"Clipboard does not contain image data");
    ExpectSamePixels(*picture, *Image());
}

TEST_F(ActionsTest, TheClipboardCarriesAnImageFromJobToJob) {
    auto picture = Open(zm24RGB, 7, 5, /*task=*/1);
    EXPECT_TRUE(Exec(gaSaveImage, u"dest=1", 1));
    Open(zm24RGB, 3, 4, 2);
    EXPECT_TRUE(Exec(gaOpenImage, u"source=-1", 2));
    ExpectSamePixels(*picture, *Image(2));
    plugin.caller->JobStop(gaOpenImage, 2);
}

TEST_F(ActionsTest, SaveReportsWhatFailed) {
    Open(zm24RGB, 7, 5);
    EXPECT_FALSE(Exec(gaSaveImage, u"format=1"));
    ExpectReported(2, u"File name is empty");
    Open(zm24RGB, 1, 5);
    EXPECT_FALSE(Exec(gaSaveImage, u"dest=1\r\nimage_file=" + folder.Name("x.bmp")));
    ExpectReported(5, u"Cannot copy image to clipboard");
    EXPECT_FALSE(platform::FileExists(folder.Name("x.bmp")));
    for (const char16_t* format : {u"7", u"-1", u"2147483647"}) {
        const std::u16string name = folder.Name("x.bmp");
        EXPECT_FALSE(
            Exec(gaSaveImage, std::u16string(u"format=") + format + u"\r\nimage_file=" + name));
        ExpectReported(5, u"Cannot save image file to \"" + name + u"\"");
    }
    EXPECT_EQ(ListFolder(folder.Path()), (std::vector<std::string>{"open1.bmp"}));
}

TEST_F(ActionsTest, TheSavedTypeFollowsTheFormatNotTheName) {
    Open(zm24RGB, 9, 9);
    struct TCase {
        const char16_t* format;
        std::vector<std::uint8_t> signature;
    };
    const TCase cases[] = {{u"0", {0xFF, 0xD8}},
                           {u"1", {0x89, 'P', 'N', 'G'}},
                           {u"3", {'B', 'M'}},
                           {u"abc", {0xFF, 0xD8}}};
    for (const TCase& row : cases) {
        ASSERT_TRUE(Exec(gaSaveImage,
                         u"image_file=" + folder.Name("out.txt") + u"\r\nformat=" + row.format));
        std::vector<std::uint8_t> bytes = ReadFileBytes(folder.File("out.txt"));
        bytes.resize(row.signature.size());
        EXPECT_EQ(bytes, row.signature);
    }
    EXPECT_EQ(SaveFormatAt(2)->file_type, ioGIF);
    EXPECT_EQ(SaveFormatAt(4)->file_type, ioPDF);
    EXPECT_EQ(SaveFormatAt(5)->file_type, ioTIFF);
    EXPECT_EQ(SaveFormatAt(6)->file_type, ioJP2);
}

TEST_F(ActionsTest, SavingOverTheFileThatWasOpened) {
    auto picture = Open(zm24RGB, 12, 8);
    ASSERT_TRUE(Exec(gaCropImage, u"l=2\r\nt=1\r\nr=12\r\nb=8"));
    ASSERT_TRUE(Exec(gaSaveImage, u"format=3\r\nimage_file=" + folder.Name("open1.bmp")));
    TZmBitmap reread;
    ASSERT_TRUE(reread.Read(folder.Name("open1.bmp"), nullptr, true));
    EXPECT_EQ(reread.GetWidth(), 10);
    EXPECT_EQ(reread.GetPixels(0, 0), picture->GetPixels(2, 1));
}

/// The resolution is one of the values that a file brings along; fresh parameters drop it.
TEST_F(ActionsTest, MetadataIsGoneAfterASaveWithoutIt) {
    TZmBitmap picture(8, 8, zm24RGB);
    picture.Fill(0x102030);
    TIOParams params;
    params.SetDpiX(123);
    params.SetDpiY(123);
    ASSERT_TRUE(picture.Write(folder.Name("dpi.png"), ioPNG, &params));
    const auto saved_dpi = [&](const char16_t* save_meta) {
        EXPECT_TRUE(Exec(gaSaveImage, u"format=1\r\nimage_file=" + folder.Name("out.png") +
                                          u"\r\nsave_meta=" + save_meta));
        TZmBitmap reread;
        reread.SetParamsEnabled(true);
        EXPECT_TRUE(reread.Read(folder.Name("out.png"), nullptr, true));
        return reread.GetParams()->GetDpiX();
    };
    ASSERT_TRUE(Exec(gaOpenImage, u"image_file=" + folder.Name("dpi.png")));
    const std::int32_t with_metadata = saved_dpi(u"1");
    EXPECT_EQ(with_metadata, 123);
    EXPECT_NE(saved_dpi(u"0"), 123);
    EXPECT_NE(saved_dpi(u"1"), 123) << "the image's own values were overwritten by the save before";
}

TEST_F(ActionsTest, OnlyTheStopOfTheOpenStepEndsTheImage) {
    Open(zm24RGB, 4, 4);
    for (std::int32_t action = gaSaveImage; action <= gaAddBorder; ++action) {
        plugin.caller->JobStop(action);
    }
    plugin.caller->JobStop(gaOpenImage, 2);
    ExpectSize(4, 4, u"after other stops");
    plugin.caller->JobStop(gaOpenImage);
    EXPECT_FALSE(Exec(gaSaveImage, u"format=3\r\nimage_file=" + folder.Name("x.bmp")));
}

TEST_F(ActionsTest, ResizeCallsTheEngineWithTheStatedNumbers) {
    struct TCase {
        std::int32_t width, height;
        const char16_t* text;
        std::int32_t new_width, new_height;
    };
    // Worked by hand from the sizing rules.
    constexpr TCase kCases[] = {
        {200, 100, u"image_w=50\r\nimage_h=50\r\nunits_w=1\r\nunits_h=1", 100, 50},
        {100, 200, u"calc_method=1\r\nimage_w=80\r\nimage_h=60\r\nkeep_aspect_ratio=0", 60, 80},
        {100, 100, u"calc_method=1\r\nimage_w=80\r\nimage_h=60\r\nkeep_aspect_ratio=0", 80, 60},
        {100, 200, u"calc_method=2\r\nimage_w=80\r\nimage_h=60\r\nkeep_aspect_ratio=0", 80, 60},
        {40, 20, u"image_w=20\r\nimage_h=20", 20, 10},
        {40, 20, u"image_w=20\r\nimage_h=20\r\nkeep_aspect_ratio=0", 20, 20},
        {40, 20, u"image_w=20\r\nimage_h=20\r\nkeep_aspect_ratio=no", 20, 20},
        // 150 percent of 10 by a unit of 2 are 150 pixels.
        {10, 10, u"image_w=150\r\nimage_h=30\r\nunits_w=2\r\nkeep_aspect_ratio=0", 150, 30},
        // 1 percent of 50 is 0, which keeps the width.
        {50, 20, u"image_w=1\r\nimage_h=10\r\nunits_w=1\r\nkeep_aspect_ratio=0", 50, 10},
        // Two negative numbers pass the test of the product; no image has such a size.
        {40, 20, u"image_w=-10\r\nimage_h=-30\r\nkeep_aspect_ratio=0", 40, 20},
    };
    for (const TCase& row : kCases) {
        Open(zm24RGB, row.width, row.height);
        EXPECT_TRUE(Exec(gaResizeImage, row.text));
        ExpectSize(row.new_width, row.new_height, row.text);
    }
    ExpectNothingReported();
}

TEST_F(ActionsTest, ResizeRefusesSilentlyWhenTheProductIsNotAboveZero) {
    Open(zm24RGB, 6, 6);
    for (const char16_t* text : {u"", u"image_w=5", u"image_w=0\r\nimage_h=5",
                                 u"image_w=-5\r\nimage_h=5", u"image_w=abc\r\nimage_h=5",
                                 u"image_w=65536\r\nimage_h=65536",  // 2^32: 0 in 32 bits
                                 u"image_w=65536\r\nimage_h=32768",  // 2^31: negative in 32 bits
                                 u"image_w=99999999999\r\nimage_h=5"}) {
        EXPECT_FALSE(Exec(gaResizeImage, text)) << Utf8FromUtf16(text);
    }
    ExpectNothingReported();
    ExpectSize(6, 6, u"after refusals");
}

TEST_F(ActionsTest, CropCutsTheStatedRectangle) {
    struct TCase {
        const char16_t* text;
        TRect place;  ///< in the old picture
    };
    constexpr TCase kCases[] = {
        {u"l=2\r\nt=1\r\nr=8\r\nb=5", {2, 1, 8, 5}},
        {u"l=1\r\nt=1\r\nr=-1\r\nb=-2", {1, 1, 19, 8}},
        {u"l=10\r\nr=-10\r\nul=1\r\nur=2\r\nb=10", {2, 0, 18, 10}},
        {u"l=-5\r\nr=20\r\nb=10", {15, 0, 20, 10}},
        {u"l=-5\r\nr=25\r\nt=-2\r\nb=12", {15, 8, 25, 12}},
        {u"l=-30\r\nr=5\r\nb=3", {-10, 0, 5, 3}},
        {u"r=20\r\nb=10", {0, 0, 20, 10}},
        {u"l={left}\r\nr=20\r\nb=10", {4, 0, 20, 10}},
    };
    plugin.host.variables[u"left"] = u"4";
    for (const TCase& row : kCases) {
        auto picture = Open(zm24RGB, 20, 10);
        ASSERT_TRUE(Exec(gaCropImage, row.text)) << Utf8FromUtf16(row.text);
        ExpectWindow(*picture, row.place, kWhite, row.text);
    }
}

TEST_F(ActionsTest, CropRefusesAnEmptyRectangle) {
    Open(zm24RGB, 20, 10);
    for (const char16_t* text :
         {u"", u"l=5\r\nr=5\r\nb=5", u"l=6\r\nr=5\r\nb=5", u"r=20", u"r=20\r\nb={none}",
          u"l=2147483647\r\nr=-2147483648\r\nb=5", u"r=-2147483648\r\nur=1\r\nb=5"}) {
        EXPECT_FALSE(Exec(gaCropImage, text)) << Utf8FromUtf16(text);
        ExpectReported(2, u"Invalid values");
    }
    ExpectSize(20, 10, u"after refusals");
}

TEST_F(ActionsTest, AddBorderGrowsTheImage) {
    auto picture = Open(zm24RGB, 20, 10);
    // 10 percent of 20 are 2; the negative bottom is none.
    ASSERT_TRUE(Exec(gaAddBorder, u"l=10\r\nul=1\r\nt=1\r\nr=3\r\nb=-5\r\ncolor=1193046"));
    ExpectWindow(*picture, {-2, -1, 23, 10}, {0x12, 0x34, 0x56}, u"0x123456: low byte red");
}

TEST_F(ActionsTest, BordersOfZeroWidthAndBeyondAllMemoryLeaveTheImage) {
    auto picture = Open(zm24RGB, 20, 10);
    EXPECT_TRUE(Exec(gaAddBorder, u""));
    EXPECT_TRUE(Exec(gaAddBorder, u"l=-1\r\nt=-2147483648\r\nur=1\r\nr=-50\r\nb=x"));
    const std::u16string huge = u"2147483647";
    EXPECT_FALSE(
        Exec(gaAddBorder, u"l=" + huge + u"\r\nt=" + huge + u"\r\nr=" + huge + u"\r\nb=" + huge));
    EXPECT_FALSE(
        Exec(gaCropImage, u"l=-" + huge + u"\r\nt=-" + huge + u"\r\nr=" + huge + u"\r\nb=" + huge));
    ExpectSamePixels(*picture, *Image());
}

TEST_F(ActionsTest, OneBitAndPaletteImagesTakeTheirKindOfBorder) {
    for (const TZmPixelFormat format : {zm1g, zm8p}) {
        auto picture = MakeGradient(format, 17, 6);
        ASSERT_TRUE(picture->Write(folder.Name("small.bmp"), ioBMP, nullptr));
        ASSERT_TRUE(Exec(gaOpenImage, u"image_file=" + folder.Name("small.bmp")));
        ASSERT_TRUE(Exec(gaAddBorder, u"l=3\r\nb=1\r\ncolor=255"));
        ASSERT_TRUE(Exec(gaCropImage, u"l=3\r\nr=20\r\nb=-1"));
        auto image = Image();
        ASSERT_EQ(image->GetWidth(), 17);
        ASSERT_EQ(image->GetHeight(), 6);
        for (std::int32_t x = 0; x < 17; ++x) {
            EXPECT_EQ(image->GetPixels(x, 5), picture->GetPixels(x, 5)) << x;
        }
    }
}

TEST_F(ActionsTest, RotateTurnsClockwiseAndFlips) {
    const struct {
        const char16_t* text;
        double angle;  // of the bitmap, 0 for a flip
        TFlipDir flip;
    } kCases[] = {{u"angle=90", -90, fdNone},       {u"action=0\r\nangle= -30 ", 30, fdNone},
                  {u"angle={degrees}", -7, fdNone}, {u"angle=-2147483648", 2147483648.0, fdNone},
                  {u"angle=360", 360, fdNone},      {u"action=1\r\nangle=90", 0, fdHorizontal},
                  {u"action=2", 0, fdVertical}};
    plugin.host.variables[u"degrees"] = u"7";
    for (const auto& c : kCases) {
        auto picture = Open(zm24RGB, 15, 9);
        ASSERT_TRUE(Exec(gaRotateImage, c.text)) << Utf8FromUtf16(c.text);
        picture->Rotate(c.angle, zmrBilinear, 0xFFFFFF);
        picture->Flip(c.flip);
        ExpectSamePixels(*picture, *Image());
    }
    ExpectNothingReported();
    auto picture = Open(zm24RGB, 3, 2);
    const TRGB last = picture->GetPixels(0, 1);
    ASSERT_TRUE(Exec(gaRotateImage, u"angle=90"));
    ExpectSize(2, 3, u"quarter turn");
    EXPECT_EQ(Image()->GetPixels(0, 0), last) << "clockwise";
    Open(zm24RGB, 15, 9);
    ASSERT_TRUE(Exec(gaRotateImage, u"angle=45"));
    EXPECT_EQ(Image()->GetPixels(0, 0), kWhite);
}

TEST_F(ActionsTest, RotateByNothingFailsSilently) {
    auto picture = Open(zm24RGB, 5, 4);
    plugin.host.variables[u"word"] = u"left";
    for (const char16_t* text : {u"", u"angle=0", u"angle=x", u"angle={word}", u"angle=90.5",
                                 u"action=3\r\nangle=90", u"action=-1\r\nangle=90"}) {
        EXPECT_FALSE(Exec(gaRotateImage, text)) << Utf8FromUtf16(text);
    }
    ExpectNothingReported();
    ExpectSamePixels(*picture, *Image());
}

TEST_F(ActionsTest, ExpansionAsksTheHostOnlyForBraces) {
    EXPECT_EQ(ExpandVariables(u"plain } text"), u"plain } text");
    EXPECT_TRUE(plugin.host.expand_sizes.empty());
    plugin.host.variables[u"name"] = u"value";
    EXPECT_EQ(ExpandVariables(u"a {name} b"), u"a value b");
    EXPECT_EQ(plugin.host.expand_sizes, (std::vector<std::int32_t>{65535}));
}

TEST_F(ActionsTest, LongExpansionsTakeOneSecondCall) {
    const std::int64_t before = plugin.host.OutstandingBytes();
    // 32767 characters fit with no room for the terminator, 32766 do.
    plugin.host.variables[u"v"] = std::u16string(32766, u'x');
    EXPECT_EQ(ExpandVariables(u"{v}").size(), 32766u);
    EXPECT_EQ(plugin.host.expand_sizes.size(), 1u);
    plugin.host.variables[u"v"] = std::u16string(32767, u'y');
    EXPECT_EQ(ExpandVariables(u"{v}"), std::u16string(32767, u'y'));
    plugin.host.variables[u"v"] = std::u16string(1 << 20, u'z');
    EXPECT_EQ(ExpandVariables(u"{v}").size(), std::size_t{1} << 20);
    EXPECT_EQ(plugin.host.expand_sizes,
              (std::vector<std::int32_t>{65535, 65535, 65536, 65535, (1 << 21) + 2}));

    plugin.host.expand_sizes.clear();
    plugin.host.always_more_bytes = -10;
    EXPECT_EQ(ExpandVariables(u"{v}"), std::u16string((1 << 20) - 4, u'z')) << "cut, no third call";
    EXPECT_EQ(plugin.host.expand_sizes.size(), 2u);
    plugin.host.always_more_bytes = -(1 << 22);
    EXPECT_EQ(ExpandVariables(u"{v}"), u"") << "a negative size";
    EXPECT_EQ(plugin.host.OutstandingBytes(), before);
    EXPECT_EQ(plugin.host.HeapFaults(), 0);
}

TEST_F(ActionsTest, PickedVariables) {
    plugin.host.selected_variable = u"SomeName";
    EXPECT_EQ(SelectVariable(), u"SomeName");
    plugin.host.selected_variable = std::u16string(3000, u'n');
    EXPECT_EQ(SelectVariable().size(), 1024u);
}

TEST_F(ActionsTest, MessagesOfManyLines) {
    ReportJobError(9, 42, u"first\r\n\r\nsecond\nthird\r");
    EXPECT_EQ(plugin.host.Errors(),
              (std::vector<THostError>{{9, 42, u"first\r\n\r\nsecond\nthird\r"}}));
    EXPECT_EQ(plugin.host.Lines(),
              (std::vector<THostLine>{{2, u"first"}, {2, u"second"}, {2, u"third"}}));
}

TEST(HostWithoutSetLastError, GetsTheLogLinesOnly) {
    TTestHost host(hsLinked);
    host.app_info.SetLastError = nullptr;
    AllowAnotherInitializeForTests();
    auto data_module = std::make_unique<TDM>();
    TPluginCaller caller(host, data_module->Init(host.app_info));
    EXPECT_FALSE(caller.Exec(gaSaveImage, u""));
    EXPECT_TRUE(host.Errors().empty());
    EXPECT_EQ(host.Lines().size(), 1u);
    data_module.reset();
    AllowAnotherInitializeForTests();
}

}  // namespace
}  // namespace zm::test
