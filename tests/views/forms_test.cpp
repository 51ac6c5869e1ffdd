// The real dialogs on a display, worked as a user works them. Those of the built plug-in come
// through the host's contract, the toolkit by itself where the scale is ours.
#include <string>
#include <vector>

#include "actions/uActionFormLayout.h"
#include "actions/views/uFormToolkit.h"
#include "engine/foundation/zmstrings.h"
#include "tests/views/formsfixture.h"

namespace zm::test {
namespace {

TEST_F(RealForms, TypedAndToggledValuesAreStored) {
    user.In(ResizeImageForm(), [](const TFormWindow& form) {
        EXPECT_EQ(form.Text(u"edtImageW"), u"300");
        EXPECT_EQ(form.Text(u"lblWidth"), u"Max Width:");
        form.Choose(u"rgCalcMethod", 1);
        EXPECT_EQ(form.Text(u"lblHeight"), u"Max Short Side:");
        form.Choose(u"cbUnitsW", 1);
        form.Choose(u"cbUnitsH", 1);
        form.Type(u"edtImageW", u"5_0&%");
        EXPECT_EQ(form.Text(u"edtImageH"), u"5_0&%") << "not linked";
        form.Press(u"cbKeepAspectRatio");
        form.Type(u"edtImageH", u"\u00E4\U0001F600");
    });
    user.Press(ResizeImageForm(), u"btnOk");
    EXPECT_EQ(Configure(gaResizeImage, u"other=1\r\n", -1),
              u"calc_method=1\r\nimage_w=5_0&%\r\nimage_h=\u00E4\U0001F600\r\nunits_w=1\r\n"
              u"units_h=1\r\nkeep_aspect_ratio=0\r\n");
}

TEST_F(RealForms, AFailedCheckKeepsTheDialogOpen) {
    user.Press(OpenImageForm(), u"btnOk");
    user.In(OpenImageForm(), [](const TFormWindow& form) {
        EXPECT_TRUE(form.IsEnabled(u"edtImageFile"));
        form.Choose(u"rgSource", 1);
        EXPECT_FALSE(form.IsEnabled(u"edtImageFile"));
        EXPECT_FALSE(form.IsEnabled(u"btnSelectFile"));
    });
    user.PressKey(OpenImageForm(), tkEnter);
    EXPECT_EQ(Configure(gaOpenImage, u"", -1), u"source=1\r\n");
}

TEST_F(RealForms, CancelEscapeAndTheCloseBoxLeaveTheBlock) {
    const std::u16string odd = u"image_file=a\nb\r=c\r\n\r\nsource=9";
    using TEnd = void (*)(const TFormWindow&);
    constexpr TEnd kEnds[] = {
        [](const TFormWindow& form) { form.Press(u"btnCancel"); },
        [](const TFormWindow& form) { PressKey(form.window, tkEscape); },
        [](const TFormWindow& form) { PressCloseBox(form.window); },
    };
    for (const TEnd end : kEnds) {
        user.In(OpenImageForm(),
                [](const TFormWindow& form) { form.Type(u"edtImageFile", u"changed"); });
        user.In(OpenImageForm(), end);
        EXPECT_EQ(Configure(gaOpenImage, odd, 0), odd);
    }
}

TEST_F(RealForms, VariablesGoToTheCaretOfTheFocusedEdit) {
    const TActionFormDesign& text = TextOnImageForm();
    LoadedModule().host.selected_variable = u"{name}";
    user.In(text, [](const TFormWindow& form) {
        form.Focus(u"edtText");
        form.Type(u"edtText", u"\U0001F600ab");
        form.PutCaret(u"edtText", 3);
        form.Press(u"SpeedButton1");
        EXPECT_EQ(form.Caret(u"edtText"), 9);
        EXPECT_TRUE(form.HasFocus(u"edtText")) << "the button took the focus";
        EXPECT_EQ(form.Text(u"edtText"), u"\U0001F600a{name}b");
        form.Focus(u"cbXPos");
    });
    // On another control than an edit an error is shown, and the dialog stays.
    user.Press(text, u"SpeedButton1");
    user.CloseMessage(text.caption, u"Invalid class typecast");
    user.Press(text, u"btnOk");
    EXPECT_TRUE(Configure(gaTextOnImage, u"", -1).starts_with(u"text=\U0001F600a{name}b\r\n"));
}

std::vector<std::u16string> ExpectedFocus(const TActionForm& form) {
    std::vector<std::u16string> names;
    for (const std::int32_t control : TabOrder(form.Design())) {
        const TFormControl& each = form.Design().controls[static_cast<std::size_t>(control)];
        const bool takes_focus = each.kind >= fcEdit && each.kind <= fcColorBox;
        if ((takes_focus || each.kind == fcButton) && form.State(control).enabled) {
            names.push_back(each.name + (each.kind == fcRadioGroup ? u"0" : u""));
        }
    }
    return names;
}

struct TLook {
    std::int32_t percent;
    const char* font;
};

/// Every form, shown directly so that the scale is ours.
class FormLooks : public testing::TestWithParam<TLook> {};

TEST_P(FormLooks, NothingIsClippedAndTheFocusGoesInOrder) {
    if (!HasDisplay()) {
        GTEST_SKIP() << "there is no display to open windows on";
    }
    std::u16string reason;
    IActionFormToolkit* const toolkit = FormToolkitProvider()(reason);
    ASSERT_NE(toolkit, nullptr) << Utf8FromUtf16(reason);
    UseDialogFont(GetParam().font);
    for (const TActionFormDesign* design : AllForms()) {
        SCOPED_TRACE(Utf8FromUtf16(design->class_name));
        TActionForm form(*design);
        TUser user;
        user.WhenReady(design->caption, [&](TWindow shown) {
            // Asked for in the same act: without a desktop a window can lose the keyboard again.
            if (!HasKeyboard(shown)) {
                return false;
            }
            const TFormWindow window(shown, *design);
            ExpectFits(window, GetParam().percent);
            EXPECT_EQ(FocusRound(window), ExpectedFocus(form));
            return true;
        });
        user.Press(*design, u"btnCancel");
        EXPECT_TRUE(toolkit->ShowModal(form, {GetParam().percent, nullptr}, reason))
            << Utf8FromUtf16(reason);
        EXPECT_EQ(form.Result(), frCancel);
    }
}

INSTANTIATE_TEST_SUITE_P(Scales, FormLooks,
                         testing::Values(TLook{100, "DejaVu Sans 10"}, TLook{150, "DejaVu Sans 10"},
                                         TLook{250, "DejaVu Sans 10"},
                                         TLook{100, "DejaVu Sans Bold 15"}));

}  // namespace
}  // namespace zm::test
