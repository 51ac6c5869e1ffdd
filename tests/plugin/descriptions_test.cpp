// The one-line descriptions, through the functions that the host calls.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "actions/uColorNames.h"
#include "engine/foundation/zmstrings.h"
#include "tests/plugin/testhost.h"

namespace zm::test {
namespace {

struct TDescriptionCase {
    std::int32_t action;
    const char16_t* text;
    const char16_t* expected;
};

constexpr TDescriptionCase kCases[] = {
    {gaOpenImage, u"", u"Open image from '<empty>'"},
    {gaOpenImage, u"source=0\r\nimage_file=C:\\it's {n}.jpg\r\n",
     u"Open image from 'C:\\it''s {n}.jpg'"},
    {gaOpenImage, u"image_file=", u"Open image from ''"},
    {gaOpenImage, u"source=1\r\nimage_file=a.png", u"Open image from Clipboard"},
    {gaOpenImage, u"source=2\r\nimage_file=a.png", u""},
    {gaSaveImage, u"", u"Save image to '<empty>'"},
    {gaSaveImage, u"dest=0\r\nimage_file=b.png\r\nsource=1", u"Save image to 'b.png'"},
    {gaSaveImage, u"dest=1", u"Save image to Clipboard"},
    {gaSaveImage, u"dest=-1", u""},
    {gaResizeImage, u"", u"Resize image to ?px x ?px (keep aspect ratio)"},
    {gaResizeImage, u"image_w=300\r\nimage_h={h}\r\nunits_h=1\r\nkeep_aspect_ratio=0",
     u"Resize image to 300px x {h}%"},
    {gaResizeImage, u"image_w=50\r\nimage_h=50\r\nunits_w=-2\r\nunits_h=7",
     u"Resize image to 50% x 50% (keep aspect ratio)"},
    {gaCropImage, u"", u"Crop image (?px, ?px) - (?px, ?px)"},
    {gaCropImage, u"l=0\r\nt=0\r\nr=0\r\nb=0", u"Crop image (0px, 0px) - (0px, 0px)"},
    {gaCropImage, u"l=1\r\nt=2\r\nr=-3\r\nb=4\r\nul=1\r\nur=1",
     u"Crop image (1%, 2px) - (-3%, 4px)"},
    {gaRotateImage, u"", u"Rotate image by ? degrees"},
    {gaRotateImage, u"angle=-90", u"Rotate image by -90 degrees"},
    {gaRotateImage, u"angle=5\r\naction=1", u"Flip image horizontally"},
    {gaRotateImage, u"action=2", u"Flip image vertically"},
    {gaTextOnImage, u"", u"Draw \"?\" on image"},
    {gaTextOnImage, u"text=a \"b\" = c", u"Draw \"a \"b\" = c\" on image"},
    {gaImageOnImage, u"", u"Draw \"?\" on image"},
    {gaImageOnImage, u"image_file=logo.png", u"Draw \"logo.png\" on image"},
    {gaAddBorder, u"", u"Add black border (width: ?px)"},
    {gaAddBorder, u"l=5\r\nt=5\r\nr=5\r\nb=5\r\ncolor=255", u"Add red border (width: 5px)"},
    {gaAddBorder, u"l=5\r\nt=5\r\nr=5\r\nb=5\r\nub=1\r\ncolor=1193046",
     u"Add #123456 border (left: 5px, top: 5px, right: 5px, bottom: 5%)"},
    {gaAddBorder, u"l=1\r\nt=2\r\nr=3\r\nb=4\r\ncolor=-16777201",
     u"Add btnface border (left: 1px, top: 2px, right: 3px, bottom: 4px)"},
};

TEST(Descriptions, FollowTheStoredText) {
    TLinkedPlugin plugin;
    for (const TDescriptionCase& row : kCases) {
        EXPECT_EQ(plugin.caller->Describe(row.action, row.text), row.expected)
            << Utf8FromUtf16(row.text);
    }
    EXPECT_TRUE(plugin.host.expand_sizes.empty()) << "a description expands no variable";
}

TEST(Descriptions, KeepUnpairedSurrogatesAndCutAt256) {
    TLinkedPlugin plugin;
    const std::u16string broken = u"\xD800 \xDC80 \xDFFF";
    EXPECT_EQ(plugin.caller->Describe(gaTextOnImage, u"text=" + broken),
              u"Draw \"" + broken + u"\" on image");
    const std::u16string frame = u"Draw \"\" on image";
    const std::u16string fitting(256 - frame.size(), u'x');
    EXPECT_EQ(plugin.caller->Describe(gaTextOnImage, u"text=" + fitting).size(), 256u);
    const std::u16string cut = plugin.caller->Describe(gaTextOnImage, u"text=x" + fitting);
    EXPECT_EQ(cut, (u"Draw \"x" + fitting + u"\" on i..."));
}

TEST(ColorNames, NameValuesAsThePlatformDoes) {
    struct TCase {
        std::uint32_t value;
        const char16_t* text;
        const char16_t* description;
    };
    constexpr TCase kColors[] = {
        {0xFFFFFF, u"clWhite", u"white"},
        {0xFF0000, u"clBlue", u"blue"},
        {0xC0DCC0, u"clMoneyGreen", u"moneygreen"},
        {0xFF000015, u"cl3DDkShadow", u"3ddkshadow"},
        {0xFF00000A, u"clActiveBorder", u"activeborder"},
        {0x1FFFFFFF, u"clNone", u"none"},
        {0x20000000, u"clDefault", u"default"},
        {0x00ABCDEF, u"$00ABCDEF", u"#ABCDEF"},
        {0x00000001, u"$00000001", u"#000001"},
        {0x02FF00FF, u"$02FF00FF", u"$02FF00FF"},
        {0xFF000019, u"$FF000019", u"$FF000019"},
    };
    for (const TCase& row : kColors) {
        EXPECT_EQ(ColorToText(static_cast<TColor>(row.value)), row.text);
        EXPECT_EQ(ColorDescription(static_cast<TColor>(row.value)), row.description);
    }
}

}  // namespace
}  // namespace zm::test
