// What the forms do while the user works in them.
#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "tests/actions/formsupport.h"
#include "tests/plugin/testhost.h"

namespace zm::test {
namespace {

/// Names of the disabled controls, in the order of the form.
std::u16string Disabled(const TDrivenForm& driven) {
    std::u16string names;
    std::int32_t index = 0;
    for (const TFormControl& control : driven.form.Design().controls) {
        const TFormControlState& state = driven.form.State(index++);
        if (!state.enabled) {
            names += control.name + u" ";
        }
        const bool grey = !state.enabled && (control.kind == fcEdit || control.kind == fcComboBox);
        EXPECT_EQ(state.background, grey ? kColorBtnFace : kColorWindow);
    }
    return names;
}

struct TEnablingCase {
    const TActionFormDesign& (*form)();
    const char16_t* chooser;
    std::u16string stored;  ///< settings that choose `index`
    std::int32_t index;
    std::u16string disabled;
};

TEST(FormRules, Enabling) {
    const TEnablingCase kCases[] = {
        {&OpenImageForm, u"rgSource", u"source=1", 1, u"edtImageFile btnSelectFile "},
        {&SaveImageForm, u"rgDest", u"dest=1", 1,
         u"lblImageFile edtImageFile btnSelectFile lblImageFormat cbImageFormat "},
        {&RotateImageForm, u"rgAction", u"action=1", 1, u"lblAngle edtAngle lblHint "},
        {&RotateImageForm, u"rgAction", u"action=2", 2, u"lblAngle edtAngle lblHint "},
        {&TextOnImageForm, u"cbXPos", u"x_pos=0", 0, u"edtCustomX lblCustomX "},
        {&TextOnImageForm, u"cbYPos", u"y_pos=2", 2, u"edtCustomY lblCustomY "},
        {&ImageOnImageForm, u"cbXPos", u"x_pos=1", 1, u"edtCustomX lblCustomX "},
        {&ImageOnImageForm, u"cbYPos", u"y_pos=0", 0, u"edtCustomY lblCustomY "},
    };
    for (const TEnablingCase& row : kCases) {
        TDrivenForm driven(row.form());
        EXPECT_EQ(Disabled(driven), u"");
        const std::int32_t before = driven.State(row.chooser).index;
        driven.Choose(row.chooser, row.index);
        EXPECT_EQ(Disabled(driven), row.disabled);
        const auto told = static_cast<std::ptrdiff_t>(driven.view.told.size());
        EXPECT_EQ(told, std::count(row.disabled.begin(), row.disabled.end(), u' '));
        driven.Choose(row.chooser, before);
        EXPECT_EQ(Disabled(driven), u"");
        EXPECT_EQ(Disabled(TDrivenForm(row.form(), row.stored)), row.disabled)
            << "a form opens in line with its settings";
    }
    for (const auto form : {&ResizeImageForm, &CropImageForm, &AddBorderForm}) {
        EXPECT_EQ(Disabled(TDrivenForm(form())), u"");
    }
}

TEST(FormRules, CheckOnOk) {
    struct TCase {
        const TActionFormDesign& (*form)();
        const char16_t* stored;
        bool passes;
    };
    constexpr TCase kCases[] = {
        {&OpenImageForm, u"", false},        {&OpenImageForm, u"image_file= ", true},
        {&OpenImageForm, u"source=1", true}, {&SaveImageForm, u"", false},
        {&SaveImageForm, u"dest=1", true},   {&SaveImageForm, u"image_file=a", true},
        {&ResizeImageForm, u"", true},       {&CropImageForm, u"", true},
        {&RotateImageForm, u"", true},       {&TextOnImageForm, u"", false},
        {&TextOnImageForm, u"text=a", true}, {&ImageOnImageForm, u"", false},
        {&AddBorderForm, u"", true},         {&ImageOnImageForm, u"image_file=a", true},
    };
    for (const TCase& row : kCases) {
        TDrivenForm driven(row.form(), row.stored);
        driven.Press(u"btnOk");
        EXPECT_EQ(driven.form.Result(), row.passes ? frOk : frNone);
        EXPECT_EQ(driven.view.closed, row.passes ? 1 : 0);
        EXPECT_EQ(driven.view.beeps, std::vector<std::uint32_t>(row.passes ? 0 : 1, 48));
        driven.Press(u"btnCancel");
        EXPECT_EQ(driven.form.Result(), frCancel);
    }
}

TEST(FormRules, LabelsOfResize) {
    TDrivenForm resize(ResizeImageForm());
    const auto labels = [&resize] {
        return resize.State(u"lblWidth").text + u" " + resize.State(u"lblHeight").text;
    };
    EXPECT_EQ(labels(), u"Max &Width: Max &Height:");
    resize.Choose(u"rgCalcMethod", 1);
    EXPECT_EQ(labels(), u"Max &Long Side: Max &Short Side:");
    resize.Check(u"cbKeepAspectRatio", false);
    EXPECT_EQ(labels(), u"&Long Side: &Short Side:");
    resize.view.told.clear();
    resize.Choose(u"rgCalcMethod", 0);
    EXPECT_EQ(labels(), u"&Width: &Height:");
    EXPECT_EQ(resize.view.told,
              (std::vector<TTestView::TChange>{{resize.form.IndexOf(u"lblWidth"), fchText},
                                               {resize.form.IndexOf(u"lblHeight"), fchText}}));
}

TEST(FormRules, PercentagesOfAFixedRatioAreLinked) {
    TDrivenForm resize(ResizeImageForm(), u"image_w=50\nimage_h=60\nunits_w=1\nunits_h=1");
    EXPECT_EQ(resize.State(u"edtImageH").text, u"60") << "stored values are no change";
    // A toolkit tells of texts that were set as of texts that were typed.
    resize.view.on_change = [&resize](std::int32_t control, std::uint8_t) {
        resize.form.SetText(control, resize.form.State(control).text);
    };
    resize.Type(u"edtImageW", u"70");
    EXPECT_EQ(resize.State(u"edtImageH").text, u"70");
    resize.Type(u"edtImageH", u"");
    EXPECT_EQ(resize.State(u"edtImageW").text, u"");
    resize.Choose(u"cbUnitsW", 0);
    resize.Type(u"edtImageW", u"1");
    resize.Choose(u"cbUnitsW", 1);
    resize.Choose(u"cbUnitsH", 0);
    resize.Type(u"edtImageW", u"2");
    resize.Choose(u"cbUnitsH", 1);
    resize.Check(u"cbKeepAspectRatio", false);
    resize.Type(u"edtImageW", u"3");
    EXPECT_EQ(resize.State(u"edtImageH").text, u"");
}

TEST(FormRules, SampleFollowsTextAndFont) {
    TDrivenForm text(TextOnImageForm(), u"text=old\nfont_size=9");
    EXPECT_EQ(text.State(u"panSample").text, u"old");
    text.Type(u"edtText", u"a&b");
    EXPECT_EQ(text.State(u"panSample").text, u"a&b");
    text.view.picked_font = {u"Serif\nx=1", 20, 255, 0xF5};
    text.view.told.clear();
    text.Press(u"btnSelectFont");
    EXPECT_EQ(text.view.offered_font, (TFormFont{u"Tahoma", 9, 0, 0}));
    EXPECT_EQ(text.State(u"panSample").font, (TFormFont{u"Serif", 20, 255, 5}));
    EXPECT_EQ(text.view.told,
              (std::vector<TTestView::TChange>{{text.form.IndexOf(u"panSample"), fchFont}}));
    text.view.confirms = false;
    text.view.picked_font = {u"Other", 1, 1, 1};
    text.Press(u"btnSelectFont");
    EXPECT_EQ(text.State(u"panSample").font.name, u"Serif");
}

TEST(FormRules, FilePickerStartsInTheFolderOfTheEdit) {
    TDrivenForm open(OpenImageForm(), u"image_file=/data/in/a.png");
    open.Press(u"btnSelectFile");
    EXPECT_EQ(open.State(u"edtImageFile").text, u"/data/in/a.png") << "nothing was picked";
    open.view.picked_file = u"/b.png";
    open.Press(u"btnSelectFile");
    EXPECT_EQ(open.State(u"edtImageFile").text, u"/b.png");
    EXPECT_EQ(open.view.file_picks,
              (std::vector<TTestView::TPick>{{fpOpen, u"/data/in/"}, {fpOpen, u"/data/in/"}}));
    open.Choose(u"rgSource", 1);
    open.Press(u"btnSelectFile");
    EXPECT_EQ(open.view.file_picks.size(), 2u) << "a disabled button";
    const std::vector<std::u16string> readable = open.view.offered_filters.at(0).extensions;
    EXPECT_NE(std::find(readable.begin(), readable.end(), u"jpeg"), readable.end());
    EXPECT_TRUE(open.view.offered_filters.at(1).extensions.empty()) << "all files";
    TDrivenForm save(SaveImageForm());
    save.Press(u"btnSelectFile");
    const std::vector<std::u16string> written = save.view.offered_filters.at(0).extensions;
    EXPECT_NE(std::find(written.begin(), written.end(), u"png"), written.end());
    EXPECT_EQ(std::find(written.begin(), written.end(), u"pcx"), written.end())
        << "no step saves in that format";
    EXPECT_EQ(save.view.file_picks, (std::vector<TTestView::TPick>{{fpSave, u""}}));
}

class VariableButton : public testing::Test {
protected:
    /// Presses "{V}" in the Resize form, whose width is 3 and two surrogate pairs.
    std::int32_t Press(const char16_t* active, std::int32_t caret) {
        return resize.form.PressInsertVariable(active == nullptr ? -1 : resize.form.IndexOf(active),
                                               caret);
    }
    const std::u16string& Width() const { return resize.State(u"edtImageW").text; }

    TLinkedPlugin plugin;
    TDrivenForm resize{ResizeImageForm(), u"image_w=3\U0001F600x\nunits_w=1\nunits_h=1"};
};

TEST_F(VariableButton, InsertsAtTheCaret) {
    plugin.host.selected_variable = u"{v}";
    EXPECT_EQ(Press(u"edtImageW", 1), 4);
    EXPECT_EQ(Width(), u"3{v}\U0001F600x");
    EXPECT_EQ(resize.State(u"edtImageH").text, Width()) << "the user's change as any other";
    EXPECT_EQ(Press(u"edtImageW", 5), 9) << "not inside a surrogate pair";
    EXPECT_EQ(Width(), u"3{v}\U0001F600{v}x");
    EXPECT_EQ(Press(u"edtImageW", 2147483647), 13);
    EXPECT_EQ(Press(u"edtImageW", -1), 3);
    EXPECT_EQ(Width(), u"{v}3{v}\U0001F600{v}x{v}");
    EXPECT_TRUE(resize.view.errors.empty());
}

TEST_F(VariableButton, NamesOfAnyContent) {
    plugin.host.selected_variable = u"";
    EXPECT_EQ(Press(u"rgCalcMethod", 2), 2) << "nothing was picked, so nothing is asked of a class";
    plugin.host.selected_variable = u"\r\nunits_w=0";
    EXPECT_EQ(Press(u"edtImageW", 1), 1);
    EXPECT_EQ(Width(), u"3\U0001F600x");
    plugin.host.selected_variable = u"=\x01\xD800&{}\nunits_w=0";
    EXPECT_EQ(Press(u"edtImageW", 0), 6);
    EXPECT_EQ(Width(), u"=\x01\xD800&{}3\U0001F600x");
    plugin.host.selected_variable = std::u16string(3000, u'n');
    EXPECT_EQ(Press(u"edtImageW", 0), 1024);
}

TEST_F(VariableButton, AnotherClassOfControlIsAnError) {
    plugin.host.selected_variable = u"v";
    EXPECT_EQ(Press(u"rgCalcMethod", 0), 0);
    EXPECT_EQ(Press(nullptr, 0), 0);
    EXPECT_EQ(resize.view.errors, std::vector<std::u16string>(2, u"Invalid class typecast"));
    EXPECT_EQ(resize.form.Result(), frNone);
    EXPECT_TRUE(resize.view.told.empty());
}

}  // namespace
}  // namespace zm::test
