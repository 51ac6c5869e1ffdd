// What only the dialogs of this system do.
#include <string>
#include <vector>

#include "actions/views/uFormToolkit.h"
#include "engine/foundation/zmstrings.h"
#include "tests/support/testfiles.h"
#include "tests/views/formsfixture.h"
#include "tests/views/win32windows.h"

namespace zm::test {
namespace {

void Show(TActionForm& form, HWND main_window) {
    std::u16string reason;
    EXPECT_TRUE(FormToolkitProvider()(reason)->ShowModal(form, {100, main_window}, reason))
        << Utf8FromUtf16(reason);
}

TEST_F(RealForms, ALabelsLetterLeadsToItsField) {
    user.In(ResizeImageForm(), [](const TFormWindow& form) {
        PressVirtualKey(HandleOf(form.window), VK_TAB);
        PostMessageW(GetFocus(), WM_SYSCHAR, 'h', 1 << 29);
    });
    user.In(ResizeImageForm(),
            [](const TFormWindow& form) { EXPECT_TRUE(form.HasFocus(u"edtImageH")); });
    user.Press(ResizeImageForm(), u"btnCancel");
    Configure(gaResizeImage, u"", 0);
}

TEST_F(RealForms, PickersGiveColorsAndFonts) {
    constexpr int kRedEdit = 706;
    constexpr int kStrikeOutBox = 0x0410;
    user.In(AddBorderForm(), [](const TFormWindow& form) {
        EXPECT_EQ(form.Chosen(u"cbColor"), 10) << "red was stored";
        form.Choose(u"cbColor", 1);
        form.Choose(u"cbColor", 0);
    });
    user.In(u"Color", [](TWindow dialog) { SetDlgItemTextW(HandleOf(dialog), kRedEdit, L"123"); });
    PressDialogButton(user, u"Color", IDOK);
    user.In(AddBorderForm(), [](const TFormWindow& form) {
        EXPECT_EQ(form.Chosen(u"cbColor"), 0);
        form.Press(u"btnOk");
    });
    EXPECT_TRUE(Configure(gaAddBorder, u"color=255", -1).ends_with(u"color=123\r\n"));

    user.Press(TextOnImageForm(), u"btnSelectFont");
    user.In(u"Font", [](TWindow dialog) {
        SendDlgItemMessageW(HandleOf(dialog), kStrikeOutBox, BM_CLICK, 0, 0);
    });
    PressDialogButton(user, u"Font", IDOK);
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_EQ(
        Configure(gaTextOnImage,
                  u"text=x\r\nfont_name=Liberation Sans\r\nfont_styles=5\r\nfont_color=255", -1),
        u"text=x\r\nfont_name=Liberation Sans\r\nfont_size=16\r\nfont_color=255\r\n"
        u"font_styles=13\r\nx_pos=3\r\ny_pos=3\r\ncustom_x=0\r\ncustom_y=0\r\n");
}

TEST_F(RealForms, AColorInAnOpenListCountsWhenTheListClosesWithIt) {
    const auto press_keys = [](const TFormWindow& form, WPARAM last) {
        for (const WPARAM key : {static_cast<WPARAM>(VK_F4), static_cast<WPARAM>(VK_UP), last}) {
            PressVirtualKey(HandleOf(form.window), key);
        }
    };
    user.In(AddBorderForm(), [&](const TFormWindow& form) {
        form.Focus(u"cbColor");
        press_keys(form, VK_ESCAPE);
    });
    user.In(AddBorderForm(), [&](const TFormWindow& form) {
        EXPECT_EQ(form.Chosen(u"cbColor"), 10) << "not red";
        press_keys(form, VK_RETURN);
    });
    user.Press(AddBorderForm(), u"btnOk");
    EXPECT_TRUE(Configure(gaAddBorder, u"color=255", -1).ends_with(u"color=12632256\r\n"));
}

TEST_F(RealForms, AFileIsPickedFromTheFolderOfThePresentOne) {
    const TempFolder folder;
    const std::u16string picture = folder.Name("picture.png");
    WriteFileBytes(folder.File("picture.png"), {1, 2, 3});
    user.Press(OpenImageForm(), u"btnSelectFile");
    // The focus is in the name. One without a folder is found in the dialog's first one.
    user.In(u"Open Image File", [](TWindow) { SetWindowTextW(GetFocus(), L"picture.png"); });
    PressDialogButton(user, u"Open Image File", IDOK);
    user.Press(OpenImageForm(), u"btnOk");
    const std::u16string stored = Configure(gaOpenImage, u"image_file=" + folder.Name("x.png"), -1);
    EXPECT_TRUE(stored.ends_with(picture + u"\r\n")) << Utf8FromUtf16(stored);
}

TEST_F(RealForms, LongAndOddTextsSurvive) {
    const std::u16string huge(1 << 20, u'w');
    user.In(TextOnImageForm(), [](const TFormWindow& form) {
        const HWND edit = HandleOf(form, u"edtText");
        SendMessageW(edit, EM_SETSEL, 0, 0);
        SendMessageW(edit, EM_REPLACESEL, TRUE, reinterpret_cast<LPARAM>(L"a"));
    });
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_TRUE(
        Configure(gaTextOnImage, u"text=" + huge, -1).starts_with(u"text=a" + huge + u"\r\n"));

    const std::u16string odd = u"\xD800x\xDC80\xDBFFy\t";
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_TRUE(Configure(gaTextOnImage, u"text=" + odd, -1).starts_with(u"text=" + odd + u"\r\n"));
}

HWND NewWindow(int left, int top, int width, int height) {
    return CreateWindowExW(0, L"STATIC", L"", WS_POPUP | WS_VISIBLE, left, top, width, height,
                           nullptr, nullptr, nullptr, nullptr);
}

std::vector<DWORD_PTR> help_pages;

LRESULT CALLBACK KeepHelp(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
    if (message != WM_HELP) {
        return DefWindowProcW(window, message, wparam, lparam);
    }
    help_pages.push_back(reinterpret_cast<const HELPINFO*>(lparam)->dwContextId);
    return TRUE;
}

TEST_F(RealForms, AFormIsModalToTheMainWindowAndAsksItForHelp) {
    const HWND main_window = NewWindow(100, 50, 800, 600);
    SetWindowLongPtrW(main_window, GWLP_WNDPROC, reinterpret_cast<LONG_PTR>(&KeepHelp));
    const HWND other = NewWindow(0, 0, 20, 20);
    TActionForm form(CropImageForm());
    user.In(CropImageForm(), [&](const TFormWindow& window) {
        EXPECT_FALSE(IsWindowEnabled(main_window));
        EXPECT_FALSE(IsWindowEnabled(other));
        const RECT place = PlaceOf(HandleOf(window.window));
        EXPECT_NEAR(place.left + place.right, 2 * 500, 2);
        EXPECT_NEAR(place.top + place.bottom, 2 * 350, 2);
        PressVirtualKey(HandleOf(window.window), VK_F1);
    });
    user.Press(CropImageForm(), u"btnCancel");
    Show(form, main_window);
    EXPECT_TRUE(IsWindowEnabled(main_window));
    EXPECT_TRUE(IsWindowEnabled(other));
    EXPECT_EQ(help_pages, std::vector<DWORD_PTR>{4280});
    DestroyWindow(other);
    DestroyWindow(main_window);
}

TEST_F(RealForms, ALargerWindowGivesTheSampleItsRoom) {
    TActionForm form(TextOnImageForm());
    user.In(TextOnImageForm(), [](const TFormWindow& window) {
        const HWND dialog = HandleOf(window.window);
        const RECT before = PlaceOf(HandleOf(window, u"panSample"));
        const RECT frame = PlaceOf(dialog);
        const auto resize = [&](int width, int height) {
            SetWindowPos(dialog, nullptr, 0, 0, width, height, SWP_NOMOVE | SWP_NOZORDER);
        };
        resize(frame.right - frame.left + 60, frame.bottom - frame.top + 40);
        const RECT after = PlaceOf(HandleOf(window, u"panSample"));
        EXPECT_EQ(after.right - after.left, before.right - before.left + 60);
        EXPECT_EQ(after.bottom - after.top, before.bottom - before.top + 40);
        resize(10, 10);
        RECT client{};
        GetClientRect(dialog, &client);
        EXPECT_EQ(client.right, 404 - 16) << "smaller than the least size";
        EXPECT_EQ(client.bottom, 438 - 39);
    });
    user.Press(TextOnImageForm(), u"btnCancel");
    Show(form, nullptr);
}

}  // namespace
}  // namespace zm::test
