// What each form declares, reads and stores.
#include <gtest/gtest.h>

#include <string>

#include "actions/uColorNames.h"
#include "tests/actions/formsupport.h"

namespace zm::test {
namespace {

TEST(Forms, Properties) {
    struct TCase {
        const char16_t* class_name;
        const char16_t* caption;
        std::int32_t width;
        std::int32_t height;
        std::int32_t help_context;
    };
    constexpr TCase kCases[] = {
        {u"TfrmOpenImageAction", u"Open Image", 361, 224, 4250},
        {u"TfrmSaveImageAction", u"Save Image", 361, 316, 4260},
        {u"TfrmResizeImageAction", u"Resize Image", 361, 339, 4270},
        {u"TfrmCropImageAction", u"Crop Image", 361, 376, 4280},
        {u"TfrmRotateImageAction", u"Rotate Image", 361, 257, 4290},
        {u"TfrmTextOnImageAction", u"Draw Text on Image", 562, 399, 4300},
        {u"TfrmImageOnImageAction", u"Draw Image", 451, 332, 4310},
        {u"TfrmAddBorderAction", u"Add Border to Image", 361, 385, 4320},
    };
    for (std::size_t index = 0; index < std::size(kCases); ++index) {
        const TActionFormDesign& form = *AllForms()[index];
        const TCase& expected = kCases[index];
        EXPECT_EQ(form.class_name, expected.class_name);
        EXPECT_EQ(form.caption, expected.caption);
        EXPECT_EQ(form.client_width, expected.width);
        EXPECT_EQ(form.client_height, expected.height);
        EXPECT_EQ(form.help_context, expected.help_context);
        const bool sizeable = form.client_width == 562;
        EXPECT_EQ(form.border, sizeable ? fbsSizeable : fbsDialog);
        EXPECT_EQ(form.min_window_width, sizeable ? 404 : 0);
        EXPECT_EQ(form.min_window_height, sizeable ? 438 : 0);
    }
}

/// The block of a new step, and one in which no value is the default.
struct TStoredCase {
    const TActionFormDesign& (*form)();
    std::u16string defaults;
    std::u16string others;
};

const TStoredCase kStored[] = {
    {&OpenImageForm, u"source=0\n", u"source=1\nimage_file=C:\\a b\\{v}=1.png\n"},
    {&SaveImageForm, u"dest=0\nformat=0\nsave_meta=0\n",
     u"dest=1\nimage_file=x.tif\nformat=6\nsave_meta=1\n"},
    {&ResizeImageForm,
     u"calc_method=0\nimage_w=300\nimage_h=300\nunits_w=0\nunits_h=0\nkeep_aspect_ratio=1\n",
     u"calc_method=1\nimage_w={w}\nimage_h=-4\nunits_w=1\nunits_h=1\nkeep_aspect_ratio=0\n"},
    {&CropImageForm, u"l=0\nt=0\nr=0\nb=0\nul=0\nut=0\nur=0\nub=0\n",
     u"l=1\nt=2\nr=-3\nb=four\nul=1\nut=1\nur=1\nub=1\n"},
    {&RotateImageForm, u"action=0\nangle=90\n", u"action=2\nangle=-45\n"},
    {&TextOnImageForm,
     u"font_name=Tahoma\nfont_size=16\nfont_color=0\nfont_styles=0\nx_pos=3\ny_pos=3\n"
     u"custom_x=0\ncustom_y=0\n",
     u"text= a & b \nfont_name=Ärial\nfont_size=-7\nfont_color=-16777211\nfont_styles=15\n"
     u"x_pos=0\ny_pos=2\ncustom_x=5\ncustom_y=6\n"},
    {&ImageOnImageForm, u"x_pos=3\ny_pos=3\ncustom_x=0\ncustom_y=0\nopacity=100\n",
     u"image_file=o.png\nx_pos=1\ny_pos=0\ncustom_x=7\ncustom_y=8\nopacity=50\n"},
    {&AddBorderForm, u"l=0\nt=0\nr=0\nb=0\nul=0\nut=0\nur=0\nub=0\ncolor=0\n",
     u"l=9\nt=8\nr=7\nb=6\nul=1\nut=1\nur=1\nub=1\ncolor=123456\n"},
};

TEST(Forms, EveryKeyIsReadAndStored) {
    for (const TStoredCase& row : kStored) {
        EXPECT_EQ(TDrivenForm(row.form()).Stored(), row.defaults);
        EXPECT_EQ(TDrivenForm(row.form(), row.others).Stored(), row.others);
    }
}

TEST(Forms, EveryKeyReachesAControlOfItsName) {
    const TDrivenForm resize(ResizeImageForm(), kStored[2].others);
    EXPECT_EQ(resize.State(u"rgCalcMethod").index, 1);
    EXPECT_EQ(resize.State(u"edtImageW").text, u"{w}");
    EXPECT_EQ(resize.State(u"edtImageH").text, u"-4");
    EXPECT_FALSE(resize.State(u"cbKeepAspectRatio").checked);
    const TDrivenForm crop(CropImageForm(), u"l=1\nt=2\nr=3\nb=4\nut=1\nub=1");
    EXPECT_EQ(crop.State(u"edtL").text + crop.State(u"edtT").text + crop.State(u"edtR").text +
                  crop.State(u"edtB").text,
              u"1234");
    EXPECT_EQ(crop.State(u"cbUnitsL").index * 8 + crop.State(u"cbUnitsT").index * 4 +
                  crop.State(u"cbUnitsR").index * 2 + crop.State(u"cbUnitsB").index,
              5);
    const TDrivenForm text(TextOnImageForm(), kStored[5].others);
    EXPECT_EQ(text.State(u"panSample").font, (TFormFont{u"Ärial", -7, -16777211, 15}));
    EXPECT_EQ(text.State(u"panSample").text, u" a & b ");
    EXPECT_EQ(text.State(u"cbXPos").index, 0);
    EXPECT_EQ(text.State(u"edtCustomY").text, u"6");
}

TEST(Forms, Items) {
    using TItems = std::vector<std::u16string>;
    const auto items = [](const TActionFormDesign& design, const char16_t* name) {
        return design.controls[static_cast<std::size_t>(TActionForm(design).IndexOf(name))].items;
    };
    EXPECT_EQ(items(SaveImageForm(), u"cbImageFormat"),
              (TItems{u"JPEG", u"PNG", u"GIF", u"BMP", u"PDF", u"TIFF", u"JPEG 2000"}));
    EXPECT_EQ(items(ResizeImageForm(), u"rgCalcMethod"),
              (TItems{u"Width && Height", u"Long Side && Short Side"}));
    EXPECT_EQ(items(RotateImageForm(), u"rgAction"),
              (TItems{u"Rotate", u"Flip Horizontal", u"Flip Vertical"}));
    EXPECT_EQ(items(AddBorderForm(), u"cbUnitsB"), (TItems{u"Pixels", u"Percent"}));
    EXPECT_EQ(items(TextOnImageForm(), u"cbXPos"),
              (TItems{u"Left", u"Center", u"Right", u"Custom"}));
    EXPECT_EQ(items(ImageOnImageForm(), u"cbYPos"),
              (TItems{u"Top", u"Center", u"Bottom", u"Custom"}));
}

TEST(Forms, IndexesOutsideTheItemsGiveTheDefault) {
    for (const std::u16string value :
         {u"-1", u"4", u"2147483647", u"-2147483648", u"99999999999", u"two", u"", u"1.0"}) {
        const std::u16string end = u"=" + value + u"\n";
        const TDrivenForm text(TextOnImageForm(), u"x_pos" + end + u"y_pos" + end);
        EXPECT_EQ(text.State(u"cbXPos").index, 3);
        EXPECT_EQ(text.State(u"cbYPos").index, 3);
        EXPECT_EQ(TDrivenForm(RotateImageForm(), u"action" + end).State(u"rgAction").index, 0);
        EXPECT_EQ(TDrivenForm(CropImageForm(), u"ub" + end).State(u"cbUnitsB").index, 0);
    }
    EXPECT_EQ(TDrivenForm(SaveImageForm(), u"format=7").State(u"cbImageFormat").index, 0);
    EXPECT_TRUE(TDrivenForm(SaveImageForm(), u"save_meta=-9").State(u"cbSaveMeta").checked);
    EXPECT_EQ(TDrivenForm(TextOnImageForm(), u"font_styles=-1").State(u"panSample").font.styles,
              15);
}

TEST(Forms, EmptiedEditsStoreNoKey) {
    TDrivenForm resize(ResizeImageForm(), u"image_w=5");
    resize.Type(u"edtImageW", u"");
    EXPECT_EQ(resize.Stored(),
              u"calc_method=0\nimage_h=300\nunits_w=0\nunits_h=0\nkeep_aspect_ratio=1\n");
}

TEST(Forms, TextsOfAnyLengthAndContent) {
    const std::u16string huge(1 << 20, u'x');
    TDrivenForm text(TextOnImageForm(), u"text=" + huge + u"\nfont_name=" + huge);
    EXPECT_EQ(text.State(u"panSample").text, huge);
    EXPECT_EQ(text.State(u"panSample").font.name, huge);
    text.Type(u"edtText", huge + u"y");
    EXPECT_EQ(Settings(text.Stored()).GetString(u"text"), huge + u"y");

    // A line break would start a key of its own in the stored text.
    for (const std::u16string line_break : {u"\r\n", u"\n", u"\r", u"\x01\n"}) {
        TDrivenForm open(OpenImageForm());
        open.Type(u"edtImageFile", u"a" + line_break + u"source=1");
        EXPECT_EQ(Settings(open.Stored()).GetInteger(u"source"), 0);
        EXPECT_EQ(open.view.told.size(), 1u) << "the view is told of what was cut";
    }
    TDrivenForm zero(OpenImageForm());
    zero.Type(u"edtImageFile", std::u16string(u"a\0b", 3));
    EXPECT_EQ(zero.State(u"edtImageFile").text, u"a");
}

TEST(Forms, ColorBox) {
    const std::vector<std::u16string> items = ColorBoxItems();
    ASSERT_EQ(items.size(), 21u);
    EXPECT_EQ(items[0], u"Custom...");
    EXPECT_EQ(items[1], u"Black");
    EXPECT_EQ(items[10], u"Red");
    EXPECT_EQ(items[17], u"Money Green");
    EXPECT_EQ(items[20], u"Medium Gray");
    EXPECT_EQ(ColorBoxColor(20), 0xA4A0A0);
    EXPECT_EQ(ColorBoxIndex(0xFF), 10);

    TDrivenForm border(AddBorderForm(), u"color=123456");
    EXPECT_EQ(border.State(u"cbColor").index, 0) << "a colour without a name is a custom one";
    border.Choose(u"cbColor", 10);
    EXPECT_EQ(border.State(u"cbColor").color, 0xFF);
    border.view.picked_color = 0x00FF00;
    border.Choose(u"cbColor", 0);
    EXPECT_EQ(border.view.offered_color, 0xFF);
    EXPECT_EQ(border.State(u"cbColor").index, 11) << "a picked colour that has a name";
    border.view.confirms = false;
    border.view.told.clear();
    border.Choose(u"cbColor", 0);
    EXPECT_EQ(border.State(u"cbColor").index, 11);
    EXPECT_EQ(border.view.told.size(), 1u) << "the list goes back to the earlier choice";
    border.Choose(u"cbColor", 21);
    border.Choose(u"cbColor", -1);
    EXPECT_EQ(border.State(u"cbColor").color, 0x00FF00);
}

}  // namespace
}  // namespace zm::test
