// What the two drawing steps do to a job's image, on pixels.
#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>

#include "engine/canvas/zmgdiplus.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfiletypes.h"
#include "tests/plugin/testhost.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr TRGB kBlack{0, 0, 0};
constexpr TRGB kGreen{10, 200, 30};

class DrawingTest : public testing::Test {
protected:
    ~DrawingTest() override { plugin.caller->JobStop(gaOpenImage, 1); }

    bool Exec(std::int32_t action, const std::u16string& text) {
        return plugin.caller->Exec(action, text, 1);
    }
    void Open(TZmBitmap& picture) {
        const std::u16string name = folder.Name("image.png");
        ASSERT_TRUE(picture.Write(name, ioPNG, nullptr));
        ASSERT_TRUE(Exec(gaOpenImage, u"image_file=" + name));
    }
    void OpenPlain(std::int32_t width, std::int32_t height, TColor color = 0) {
        TZmBitmap picture;
        ASSERT_TRUE(picture.Allocate(width, height, color, 255));
        Open(picture);
    }
    std::unique_ptr<TZmBitmap> Image() {
        const std::u16string name = folder.Name("state.png");
        EXPECT_TRUE(Exec(gaSaveImage, u"format=1\r\nimage_file=" + name));
        auto image = std::make_unique<TZmBitmap>();
        EXPECT_TRUE(image->Read(name, nullptr, true));
        return image;
    }
    /// A picture of one colour as a file; alpha below 255 makes a plane.
    void MakeOverlay(std::int32_t width, std::int32_t height, TRGB color,
                     std::int32_t alpha = 255) {
        TZmBitmap overlay;
        ASSERT_TRUE(overlay.Allocate(width, height, ColorFromRGB(color), alpha));
        ASSERT_TRUE(overlay.Write(folder.Name("overlay.png"), ioPNG, nullptr));
    }
    bool DrawOverlay(const std::u16string& text) {
        return Exec(gaImageOnImage, u"image_file=" + folder.Name("overlay.png") + u"\r\n" + text);
    }
    /// The rectangle of pixels that are not black; right and bottom exclusive.
    static TRect Ink(TZmBitmap& image) {
        TRect ink{image.GetWidth(), image.GetHeight(), 0, 0};
        for (std::int32_t y = 0; y < image.GetHeight(); ++y) {
            for (std::int32_t x = 0; x < image.GetWidth(); ++x) {
                if (image.GetPixels(x, y) != kBlack) {
                    ink = {std::min(ink.left, x), std::min(ink.top, y), std::max(ink.right, x + 1),
                           std::max(ink.bottom, y + 1)};
                }
            }
        }
        return ink;
    }
    void ExpectInk(const TRect& wanted, const std::u16string& because) {
        const TRect ink = Ink(*Image());
        EXPECT_TRUE(ink.left == wanted.left && ink.top == wanted.top && ink.right == wanted.right &&
                    ink.bottom == wanted.bottom)
            << Utf8FromUtf16(because) << ": " << ink.left << ", " << ink.top << " to " << ink.right
            << ", " << ink.bottom;
    }
    void ExpectNothingReported() {
        EXPECT_TRUE(plugin.host.Errors().empty());
        EXPECT_TRUE(plugin.host.Lines().empty());
    }
    /// Draws white text on a black image and gives the image.
    std::unique_ptr<TZmBitmap> WhiteText(const std::u16string& text, std::int32_t width = 160,
                                         std::int32_t height = 60) {
        OpenPlain(width, height);
        EXPECT_TRUE(Exec(gaTextOnImage, u"font_color=16777215\r\nx_pos=0\r\ny_pos=0\r\n" + text));
        return Image();
    }

    TLinkedPlugin plugin;
    TempFolder folder;
};

// Pictures.

TEST_F(DrawingTest, PicturePositionsOfBothAxes) {
    struct TCase {
        const char16_t* keys;
        TRect ink;  // of a picture of 4 by 3 on one of 11 by 8
    };
    const TCase cases[] = {{u"", {0, 0, 4, 3}},  // custom, at 0 by default
                           {u"x_pos=0\r\ny_pos=2\r\ncustom_x=5", {0, 5, 4, 8}},
                           {u"x_pos=1\r\ny_pos=1", {3, 2, 7, 5}},  // 7 and 5 halved
                           {u"x_pos=2\r\ny_pos=0", {7, 0, 11, 3}},
                           {u"x_pos=5\r\ncustom_x=6\r\ny_pos=-1\r\ncustom_y={four}", {6, 4, 10, 7}},
                           {u"custom_x=-3\r\ncustom_y=-1", {0, 0, 1, 2}},
                           {u"custom_x=10\r\ncustom_y=7", {10, 7, 11, 8}},
                           {u"custom_x=word\r\nx_pos=word", {0, 0, 4, 3}}};
    plugin.host.variables[u"four"] = u"4";
    MakeOverlay(4, 3, kGreen);
    for (const TCase& row : cases) {
        OpenPlain(11, 8);
        EXPECT_TRUE(DrawOverlay(row.keys));
        ExpectInk(row.ink, row.keys);
    }
    for (const char16_t* keys : {u"custom_x=2147483647", u"custom_x=-2147483648",
                                 u"custom_y=2147483647", u"custom_y=-2147483648"}) {
        OpenPlain(11, 8);
        EXPECT_TRUE(DrawOverlay(keys)) << "nothing to see is no failure";
        ExpectInk({11, 8, 0, 0}, keys);
    }
}

TEST_F(DrawingTest, LargerPicturesGetNegativePositions) {
    OpenPlain(5, 4);
    auto overlay = MakeGradient(zm24RGB, 8, 7);
    ASSERT_TRUE(overlay->Write(folder.Name("overlay.png"), ioPNG, nullptr));
    // (5 - 8) / 2 and (4 - 7) / 2 truncate to -1.
    EXPECT_TRUE(DrawOverlay(u"x_pos=1\r\ny_pos=1"));
    auto image = Image();
    EXPECT_EQ(image->GetWidth(), 5);
    EXPECT_EQ(image->GetPixels(0, 0), overlay->GetPixels(1, 1));
    EXPECT_EQ(image->GetPixels(4, 3), overlay->GetPixels(5, 4));
    EXPECT_TRUE(DrawOverlay(u"x_pos=2\r\ny_pos=2"));
    EXPECT_EQ(Image()->GetPixels(0, 0), overlay->GetPixels(3, 3));
    // One pixel narrower: a half of 1 truncates to 0.
    OpenPlain(9, 8);
    EXPECT_TRUE(DrawOverlay(u"x_pos=1\r\ny_pos=1"));
    EXPECT_EQ(Image()->GetPixels(0, 0), overlay->GetPixels(0, 0));
}

TEST_F(DrawingTest, OpacityArithmetic) {
    struct TCase {
        const char16_t* opacity;
        std::int32_t alpha;  // of the picture
        std::uint8_t green;  // of 200 over 0
    };
    const TCase cases[] = {
        {u"100", 255, 200},  // a plain copy
        {u"250", 255, 200},
        {u"word", 255, 200},
        {u"", 255, 200},
        {u"-20", 255, 0},
        {u"0", 255, 0},
        // Without a plane the opacity acts twice: 255 x 0.5 = 127, 127 x 0.5 = 63 of 256.
        {u"50", 255, 49},   // 200 x 63 / 256 = 49.2
        {u"{o}", 255, 31},  // 102, 40: 200 x 40 / 256 = 31.25
        // With one it acts once: 128 of 256, then 64.
        {u"100", 128, 100},
        {u"50", 128, 50},
        {u"0", 128, 0}};
    plugin.host.variables[u"o"] = u"40";
    for (const TCase& row : cases) {
        MakeOverlay(3, 3, {0, 200, 0}, row.alpha);
        OpenPlain(3, 3);
        EXPECT_TRUE(DrawOverlay(std::u16string(u"opacity=") + row.opacity));
        EXPECT_EQ(Image()->GetPixels(1, 1).g, row.green)
            << Utf8FromUtf16(row.opacity) << " alpha " << row.alpha;
    }
}

TEST_F(DrawingTest, TheImageBecomesColouredAndKeepsItsPlane) {
    MakeOverlay(2, 2, kGreen);
    for (const TZmPixelFormat format : {zm1g, zm8p, zm8g, zm16g, zm24RGB, zm48RGB}) {
        auto picture = MakeGradient(format, 6, 5);
        Open(*picture);
        EXPECT_TRUE(DrawOverlay(u"x_pos=2\r\ny_pos=2"));
        auto image = Image();
        EXPECT_EQ(image->GetPixelFormat(), zm24RGB);
        EXPECT_EQ(image->GetPixels(5, 4), kGreen) << "format " << int{format};
        EXPECT_EQ(image->GetPixels(1, 1), picture->GetPixels(1, 1)) << "format " << int{format};
    }
    auto picture = MakeGradient(zm24RGB, 6, 5);
    AddNoiseAlpha(*picture, 3);
    Open(*picture);
    EXPECT_TRUE(DrawOverlay(u"x_pos=2\r\ny_pos=2"));
    auto image = Image();
    EXPECT_EQ(image->GetPixels(5, 4), kGreen);
    ExpectSameAlpha(*picture, *image);
}

TEST_F(DrawingTest, PicturesThatCannotBeDrawnFailSilently) {
    Open(*MakeGradient(zm8p, 6, 5));
    auto before = Image();
    WriteFileBytes(folder.File("overlay.png"), {});
    EXPECT_FALSE(DrawOverlay(u"")) << "an empty file";
    WriteFileBytes(folder.File("overlay.png"), {0x89, 'P', 'N', 'G', 13, 10, 26, 10, 0});
    EXPECT_FALSE(DrawOverlay(u"")) << "a broken one";
    EXPECT_FALSE(Exec(gaImageOnImage, u"")) << "none";
    EXPECT_FALSE(Exec(gaImageOnImage, u"image_file=" + folder.Name("missing.png")));
    EXPECT_FALSE(Exec(gaImageOnImage, u"image_file=" + EngineName(folder.Path())));
    ExpectNothingReported();
    ExpectSamePixels(*before, *Image());
}

// Text.

TEST_F(DrawingTest, TextPositionsOfBothAxes) {
    TZmEmptyCanvas canvas;
    canvas.GetFont().SetSize(20);
    const TPoint size = canvas.MeasureText(u"Hill");
    ASSERT_GT(size.x, 10);
    ASSERT_GT(size.y, 10);
    const std::int32_t width = 151;
    const std::int32_t height = 90;
    const auto draw = [&](const std::u16string& keys) {
        OpenPlain(width, height);
        EXPECT_TRUE(
            Exec(gaTextOnImage, u"text=Hill\r\nfont_size=20\r\nfont_color=16777215\r\n" + keys));
        return Image();
    };
    const auto at = [&](std::int32_t x, std::int32_t y) {
        return draw(u"custom_x=" + IntegerToText(x) + u"\r\ncustom_y=" + IntegerToText(y));
    };
    const TRect ink = Ink(*at(0, 0));
    EXPECT_LE(ink.right, size.x + 1);
    EXPECT_LE(ink.bottom, size.y + 1);
    struct TCase {
        const char16_t* keys;
        std::int32_t x, y;
    };
    const TCase cases[] = {{u"", 0, 0},
                           {u"x_pos=0\r\ny_pos=0\r\ncustom_x=9\r\ncustom_y=9", 0, 0},
                           {u"x_pos=1\r\ny_pos=0", (width - size.x) / 2, 0},
                           {u"x_pos=2\r\ny_pos=1", width - size.x, (height - size.y) / 2},
                           {u"x_pos=5\r\ncustom_x=7\r\ny_pos=2", 7, height - size.y},
                           {u"custom_x={x}\r\ncustom_y=-4", 11, -4}};
    plugin.host.variables[u"x"] = u"11";
    for (const TCase& row : cases) {
        auto image = draw(row.keys);
        ExpectSamePixels(*at(row.x, row.y), *image);
        EXPECT_EQ(Ink(*image).left, row.x + ink.left) << Utf8FromUtf16(row.keys);
        EXPECT_EQ(Ink(*image).bottom, row.y + ink.bottom) << Utf8FromUtf16(row.keys);
    }
}

/// Sum of all greens: the more ink, the more.
std::int64_t InkSum(TZmBitmap& image) {
    std::int64_t sum = 0;
    for (std::int32_t y = 0; y < image.GetHeight(); ++y) {
        for (std::int32_t x = 0; x < image.GetWidth(); ++x) {
            sum += image.GetPixels(x, y).g;
        }
    }
    return sum;
}

TEST_F(DrawingTest, FontStylesShow) {
    const std::u16string text = u"text=I l i\r\nfont_size=24\r\nfont_styles=";
    auto plain = WhiteText(text + u"0");
    const TRect ink = Ink(*plain);
    const std::int32_t gap = (ink.left + ink.right) / 2 - 4;  // a blank between the letters
    const auto gap_ink = [&](TZmBitmap& image, std::int32_t top, std::int32_t bottom) {
        return Ink(*std::make_unique<TZmBitmap>(image, TRect{gap - 6, top, gap + 6, bottom}));
    };
    EXPECT_GT(InkSum(*WhiteText(text + u"1")), InkSum(*plain) * 11 / 10) << "bold";
    EXPECT_NE(InkSum(*WhiteText(text + u"2")), InkSum(*plain)) << "italic";
    auto underlined = WhiteText(text + u"4");
    EXPECT_GT(Ink(*underlined).bottom, ink.bottom) << "underlined";
    EXPECT_EQ(gap_ink(*underlined, ink.bottom, 60).right, 12) << "from letter to letter";
    auto struck = WhiteText(text + u"8");
    EXPECT_EQ(Ink(*struck).bottom, ink.bottom) << "struck out";
    EXPECT_GT(InkSum(*struck), InkSum(*plain) * 11 / 10);
    auto both = WhiteText(text + u"5");
    EXPECT_GT(InkSum(*both), InkSum(*underlined) * 21 / 20) << "bold and underlined";
    EXPECT_GT(Ink(*both).bottom, ink.bottom);
    ExpectSamePixels(*both, *WhiteText(text + u"261"));  // the low byte counts
}

TEST_F(DrawingTest, TextTakesSizeColourAndVariables) {
    // Capitals of this font are 0.729 of the em square high, whose side is points x 96 / 72.
    for (const std::int32_t points : {16, 33}) {
        const TRect ink = Ink(
            *WhiteText(u"text=HEH\r\nfont_name=DejaVu Sans\r\nfont_size=" + IntegerToText(points)));
        EXPECT_NEAR(ink.bottom - ink.top, points * 96 * 0.729 / 72, 1) << points;
    }
    ExpectSamePixels(*WhiteText(u"text=HH"), *WhiteText(u"text=HH\r\nfont_size=16"));
    plugin.host.variables[u"file"] = u"Photo";
    ExpectSamePixels(*WhiteText(u"text={file}!"), *WhiteText(u"text=Photo!"));

    OpenPlain(80, 60);
    EXPECT_TRUE(Exec(gaTextOnImage, u"text=H\r\nfont_size=36\r\nfont_color=13195"));
    auto image = Image();
    TRGB strongest;
    for (std::int32_t i = 0; i < 80 * 60; ++i) {
        const TRGB pixel = image->GetPixels(i % 80, i / 80);
        strongest = pixel.r > strongest.r ? pixel : strongest;
    }
    EXPECT_EQ(strongest, (TRGB{0, 51, 139}));  // 13195 = 51 x 256 + 139
}

TEST_F(DrawingTest, TextThatCannotShowSucceeds) {
    auto picture = MakeGradient(zm24RGB, 40, 30);
    Open(*picture);
    for (const char16_t* keys : {u"", u"text=", u"text=far away\r\ncustom_x=2147483647",
                                 u"text=far away\r\ncustom_y=-2147483648"}) {
        EXPECT_TRUE(Exec(gaTextOnImage, keys));
    }
    ExpectSamePixels(*picture, *Image());
    EXPECT_TRUE(
        Exec(gaTextOnImage, u"font_name=No Such Font Anywhere\r\ntext=much too wide for it"));
    auto image = Image();
    EXPECT_EQ(image->GetWidth(), 40);
    EXPECT_NE(InkSum(*image), InkSum(*picture)) << "a missing font is replaced";
    ExpectNothingReported();
}

}  // namespace
}  // namespace zm::test
