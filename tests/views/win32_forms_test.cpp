// The real dialogs on a display, worked by window messages: those of the built plug-in through the
// host's contract, and the toolkit by itself where the scale and the main window are ours.
#include <windows.h>

#include <algorithm>
#include <string>
#include <vector>

#include "actions/uActionFormLayout.h"
#include "actions/views/uFormToolkit.h"
#include "engine/foundation/zmstrings.h"
#include "tests/actions/formsupport.h"
#include "tests/plugin/testhost.h"
#include "tests/support/testfiles.h"
#include "tests/views/win32support.h"

namespace zm::test {
namespace {

class Win32Forms : public testing::Test {
protected:
    void SetUp() override {
        if (!HasDisplay()) {
            GTEST_SKIP() << "there is no display to open windows on";
        }
    }
    /// Configures a step while the user acts; the text afterwards. A block that stays is the same
    /// one, byte for byte.
    std::u16string Configure(std::int32_t action, const std::u16string& text, TLongBool result) {
        TLoadedModule& module = LoadedModule();
        TTestStep step(module.host, text);
        const TAFActionParams before = step.params;
        EXPECT_EQ(module.caller->Actions().ConfigAction(action, &step.params), result);
        EXPECT_TRUE(result != 0 ||
                    (step.params.PPtr == before.PPtr && step.params.Size == before.Size));
        EXPECT_EQ(module.host.HeapFaults(), 0);
        EXPECT_TRUE(module.host.Lines().empty());
        return step.Text();
    }

    TWin32User user;
};

TEST_F(Win32Forms, TypedAndToggledValuesAreStored) {
    user.In(ResizeImageForm(), [](const TFormWindow& form) {
        EXPECT_EQ(form.Text(u"edtImageW"), u"300");
        EXPECT_EQ(form.Text(u"lblWidth"), u"Max &Width:");
        SendMessageW(form.RadioItem(u"rgCalcMethod", 1), BM_CLICK, 0, 0);
        EXPECT_EQ(form.Text(u"lblHeight"), u"Max &Short Side:");
        form.Choose(u"cbUnitsW", 1);
        form.Choose(u"cbUnitsH", 1);
        form.Type(u"edtImageW", u"5_0&%");
        EXPECT_EQ(form.Text(u"edtImageH"), u"5_0&%") << "not linked";
        form.Press(u"cbKeepAspectRatio");
        form.Type(u"edtImageH", u"\u00E4\U0001F600");
        form.Key(VK_TAB);
        PostMessageW(GetFocus(), WM_SYSCHAR, 's', 1 << 29);
    });
    user.In(ResizeImageForm(), [](const TFormWindow& form) {
        EXPECT_EQ(GetFocus(), form.Control(u"edtImageH")) << "the label's letter leads there";
    });
    user.Press(ResizeImageForm(), u"btnOk");
    EXPECT_EQ(Configure(gaResizeImage, u"other=1\r\n", -1),
              u"calc_method=1\r\nimage_w=5_0&%\r\nimage_h=\u00E4\U0001F600\r\nunits_w=1\r\n"
              u"units_h=1\r\nkeep_aspect_ratio=0\r\n");
}

TEST_F(Win32Forms, AFailedCheckKeepsTheDialogOpen) {
    const TActionFormDesign& open = OpenImageForm();
    user.Press(open, u"btnOk");
    user.In(open, [](const TFormWindow& form) {
        EXPECT_TRUE(form.IsEnabled(u"edtImageFile"));
        SendMessageW(form.RadioItem(u"rgSource", 1), BM_CLICK, 0, 0);
        EXPECT_FALSE(form.IsEnabled(u"edtImageFile"));
        EXPECT_FALSE(form.IsEnabled(u"btnSelectFile"));
        form.Key(VK_RETURN);
    });
    EXPECT_EQ(Configure(gaOpenImage, u"", -1), u"source=1\r\n");
}

TEST_F(Win32Forms, CancelEscapeAndTheCloseBoxLeaveTheBlock) {
    const std::u16string odd = u"image_file=a\nb\r=c\r\n\r\nsource=9";
    const TActionFormDesign& open = OpenImageForm();
    using TEnd = void (*)(const TFormWindow&);
    constexpr TEnd kEnds[] = {
        [](const TFormWindow& form) { form.Press(u"btnCancel"); },
        [](const TFormWindow& form) { form.Key(VK_ESCAPE); },
        [](const TFormWindow& form) { PostMessageW(form.window, WM_CLOSE, 0, 0); },
    };
    for (const TEnd end : kEnds) {
        user.In(open, [](const TFormWindow& form) { form.Type(u"edtImageFile", u"changed"); });
        user.In(open, end);
        EXPECT_EQ(Configure(gaOpenImage, odd, 0), odd);
    }
}

TEST_F(Win32Forms, VariablesGoToTheCaretOfTheFocusedEdit) {
    const TActionFormDesign& text = TextOnImageForm();
    LoadedModule().host.selected_variable = u"{name}";
    user.In(text, [](const TFormWindow& form) {
        const HWND edit = form.Control(u"edtText");
        form.Type(u"edtText", u"\U0001F600ab");
        SetFocus(edit);
        SendMessageW(edit, EM_SETSEL, 3, 3);
        form.Click(u"SpeedButton1");
        DWORD caret = 0;
        SendMessageW(edit, EM_GETSEL, 0, reinterpret_cast<LPARAM>(&caret));
        EXPECT_EQ(caret, 9u);
        EXPECT_EQ(GetFocus(), edit) << "the button took the focus";
        EXPECT_EQ(form.Text(u"edtText"), u"\U0001F600a{name}b");
        SetFocus(form.Control(u"cbXPos"));
    });
    // On another control than an edit an error is shown, and the dialog stays.
    user.In(text, [](const TFormWindow& form) { form.Click(u"SpeedButton1"); });
    user.WhenReady(text.caption, [](HWND box) {
        EXPECT_NE(FindWindowExW(box, nullptr, L"Static", L"Invalid class typecast"), nullptr);
        EndDialog(box, IDOK);
        return true;
    });
    user.Press(text, u"btnOk");
    EXPECT_TRUE(Configure(gaTextOnImage, u"", -1).starts_with(u"text=\U0001F600a{name}b\r\n"));
}

TEST_F(Win32Forms, PickersGiveColorsAndFonts) {
    constexpr int kRedEdit = 706;
    constexpr int kStrikeOutBox = 0x0410;
    const TActionFormDesign& border = AddBorderForm();
    user.In(border, [](const TFormWindow& form) {
        const HWND box = form.Control(u"cbColor");
        EXPECT_EQ(SendMessageW(box, CB_GETCURSEL, 0, 0), 10) << "red was stored";
        form.Choose(u"cbColor", 1);
        form.Choose(u"cbColor", 0);
    });
    user.WhenReady(u"Color", [](HWND dialog) {
        SetDlgItemTextW(dialog, kRedEdit, L"123");
        return true;
    });
    user.Answer(u"Color", IDOK);
    user.In(border, [](const TFormWindow& form) {
        EXPECT_EQ(SendMessageW(form.Control(u"cbColor"), CB_GETCURSEL, 0, 0), 0);
        form.Press(u"btnOk");
    });
    EXPECT_TRUE(Configure(gaAddBorder, u"color=255", -1).ends_with(u"color=123\r\n"));

    user.Press(TextOnImageForm(), u"btnSelectFont");
    user.WhenReady(u"Font", [](HWND dialog) {
        SendDlgItemMessageW(dialog, kStrikeOutBox, BM_CLICK, 0, 0);
        return true;
    });
    user.Answer(u"Font", IDOK);
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_EQ(
        Configure(gaTextOnImage,
                  u"text=x\r\nfont_name=Liberation Sans\r\nfont_styles=5\r\nfont_color=255", -1),
        u"text=x\r\nfont_name=Liberation Sans\r\nfont_size=16\r\nfont_color=255\r\n"
        u"font_styles=13\r\nx_pos=3\r\ny_pos=3\r\ncustom_x=0\r\ncustom_y=0\r\n");
}

TEST_F(Win32Forms, AColorInAnOpenListCountsWhenTheListClosesWithIt) {
    const TActionFormDesign& border = AddBorderForm();
    user.In(border, [](const TFormWindow& form) {
        SetFocus(form.Control(u"cbColor"));
        for (const WPARAM key : {VK_F4, VK_UP, VK_ESCAPE}) {
            form.Key(key);
        }
    });
    user.In(border, [](const TFormWindow& form) {
        EXPECT_EQ(SendMessageW(form.Control(u"cbColor"), CB_GETCURSEL, 0, 0), 10) << "not red";
        for (const WPARAM key : {VK_F4, VK_UP, VK_RETURN}) {
            form.Key(key);
        }
    });
    user.Press(border, u"btnOk");
    EXPECT_TRUE(Configure(gaAddBorder, u"color=255", -1).ends_with(u"color=12632256\r\n"));
}

TEST_F(Win32Forms, AFileIsPickedFromTheFolderOfThePresentOne) {
    const TempFolder folder;
    const std::filesystem::path picture = folder.Path() / "picture.png";
    WriteFileBytes(picture, {1, 2, 3});
    user.Press(OpenImageForm(), u"btnSelectFile");
    user.WhenReady(u"Open Image File", [](HWND) {
        // The focus is in the name. One without a folder is found in the dialog's first one.
        SetWindowTextW(GetFocus(), L"picture.png");
        return true;
    });
    user.Answer(u"Open Image File", IDOK);
    user.In(OpenImageForm(), [](const TFormWindow& form) {
        EXPECT_TRUE(form.Text(u"edtImageFile").ends_with(u"\\picture.png"));
        form.Press(u"btnOk");
    });
    const std::u16string stored =
        Configure(gaOpenImage, u"image_file=" + (folder.Path() / "x.png").u16string(), -1);
    EXPECT_TRUE(stored.ends_with(picture.u16string() + u"\r\n")) << Utf8FromUtf16(stored);
}

TEST_F(Win32Forms, LongAndOddTextsSurvive) {
    const std::u16string huge(1 << 20, u'w');
    user.In(TextOnImageForm(), [](const TFormWindow& form) {
        SendMessageW(form.Control(u"edtText"), EM_SETSEL, 0, 0);
        SendMessageW(form.Control(u"edtText"), EM_REPLACESEL, TRUE, reinterpret_cast<LPARAM>(L"a"));
    });
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_TRUE(
        Configure(gaTextOnImage, u"text=" + huge, -1).starts_with(u"text=a" + huge + u"\r\n"));

    const std::u16string odd = u"\xD800x\xDC80\xDBFFy\t";
    user.In(TextOnImageForm(), [](const TFormWindow& form) { form.Press(u"btnOk"); });
    EXPECT_TRUE(Configure(gaTextOnImage, u"text=" + odd, -1).starts_with(u"text=" + odd + u"\r\n"));
}

/// The host's window, which counts what it is asked for.
class TMainWindow {
public:
    TMainWindow() {
        WNDCLASSW window_class{};
        window_class.lpfnWndProc = &Answer;
        window_class.hInstance = GetModuleHandleW(nullptr);
        window_class.lpszClassName = L"ZmTestMainWindow";
        RegisterClassW(&window_class);
        handle_ = CreateWindowExW(0, L"ZmTestMainWindow", L"Host", WS_POPUP | WS_VISIBLE, 100, 50,
                                  800, 600, nullptr, nullptr, window_class.hInstance, nullptr);
        help_pages.clear();
    }
    ~TMainWindow() {
        DestroyWindow(handle_);
        UnregisterClassW(L"ZmTestMainWindow", GetModuleHandleW(nullptr));
    }
    TMainWindow(const TMainWindow&) = delete;
    TMainWindow& operator=(const TMainWindow&) = delete;
    HWND Handle() const { return handle_; }

    inline static std::vector<std::int32_t> help_pages;

private:
    static LRESULT CALLBACK Answer(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
        if (message == WM_HELP) {
            const auto* const help = reinterpret_cast<const HELPINFO*>(lparam);
            help_pages.push_back(static_cast<std::int32_t>(help->dwContextId));
            return TRUE;
        }
        return DefWindowProcW(window, message, wparam, lparam);
    }

    HWND handle_ = nullptr;
};

RECT PlaceOf(HWND window) {
    RECT place{};
    GetWindowRect(window, &place);
    return place;
}

TEST_F(Win32Forms, AFormIsModalToTheMainWindowAndAsksItForHelp) {
    const TMainWindow main_window;
    const HWND other = CreateWindowExW(0, L"STATIC", L"", WS_POPUP | WS_VISIBLE, 0, 0, 20, 20,
                                       nullptr, nullptr, nullptr, nullptr);
    TActionForm form(CropImageForm());
    user.In(CropImageForm(), [&](const TFormWindow& window) {
        EXPECT_FALSE(IsWindowEnabled(main_window.Handle()));
        EXPECT_FALSE(IsWindowEnabled(other));
        const RECT place = PlaceOf(window.window);
        EXPECT_NEAR(place.left + place.right, 2 * 500, 2);
        EXPECT_NEAR(place.top + place.bottom, 2 * 350, 2);
        window.Key(VK_F1);
    });
    user.Press(CropImageForm(), u"btnCancel");
    std::u16string reason;
    EXPECT_TRUE(
        FormToolkitProvider()(reason)->ShowModal(form, {100, main_window.Handle()}, reason));
    EXPECT_TRUE(IsWindowEnabled(main_window.Handle()));
    EXPECT_TRUE(IsWindowEnabled(other));
    EXPECT_EQ(TMainWindow::help_pages, std::vector<std::int32_t>{4280});
    DestroyWindow(other);
}

/// Every form, shown directly so that the scale is ours.
class Win32Layout : public testing::TestWithParam<int> {};

/// Room that a control's text takes, without what the control draws around it.
SIZE TextRoom(HWND window, const std::u16string& text, int width) {
    const HDC device = GetDC(window);
    auto* const font = reinterpret_cast<HFONT>(SendMessageW(window, WM_GETFONT, 0, 0));
    const HGDIOBJ old_font = SelectObject(device, font);
    RECT place{0, 0, width, 0};
    DrawTextW(device, reinterpret_cast<const wchar_t*>(text.c_str()), -1, &place,
              DT_CALCRECT | (width > 0 ? DT_WORDBREAK : DT_SINGLELINE));
    SelectObject(device, old_font);
    ReleaseDC(window, device);
    return {place.right, place.bottom};
}

void ExpectRoomFor(HWND window, const std::u16string& text, int mark_width, const char* name) {
    RECT client{};
    GetClientRect(window, &client);
    const SIZE room = TextRoom(window, text, 0);
    EXPECT_GE(client.right, room.cx + mark_width) << name;
    EXPECT_GE(client.bottom, room.cy) << name;
}

void ExpectUnclipped(const TFormWindow& form, const TFormControl& control, int percent) {
    const std::string name = Utf8FromUtf16(control.name);
    const HWND window = form.Control(control.name.c_str());
    ASSERT_NE(window, nullptr) << name;
    const int mark_width = 18 * percent / 100;
    RECT client{};
    GetClientRect(window, &client);
    RECT inside{};
    GetClientRect(form.window, &inside);
    MapWindowPoints(form.window, nullptr, reinterpret_cast<POINT*>(&inside), 2);
    RECT place = PlaceOf(window);
    RECT common{};
    IntersectRect(&common, &place, &inside);
    EXPECT_TRUE(EqualRect(&common, &place)) << name << " leaves the form";
    switch (control.kind) {
        case fcLabel:
        case fcButton:
        case fcSpeedButton: ExpectRoomFor(window, TextOf(window), 0, name.c_str()); break;
        case fcCheckBox: ExpectRoomFor(window, TextOf(window), mark_width, name.c_str()); break;
        case fcEdit: ExpectRoomFor(window, u"Xg", 0, name.c_str()); break;
        case fcWrappedLabel:
            EXPECT_GE(client.bottom, TextRoom(window, TextOf(window), client.right).cy) << name;
            break;
        default: break;
    }
    for (std::size_t item = 0; control.kind == fcRadioGroup && item < control.items.size();
         ++item) {
        const HWND button = form.RadioItem(control.name.c_str(), static_cast<std::int32_t>(item));
        ExpectRoomFor(button, TextOf(button), mark_width, name.c_str());
    }
    for (const std::u16string& item : control.items) {
        if (control.kind == fcComboBox) {
            ExpectRoomFor(window, item, mark_width, name.c_str());
        }
    }
}

/// Controls in the order of the tab key, a radio group by its first item.
std::vector<HWND> FocusRound(HWND window) {
    std::vector<HWND> round;
    HWND next = GetNextDlgTabItem(window, nullptr, FALSE);
    while (next != nullptr && (round.empty() || next != round.front()) && round.size() < 50) {
        round.push_back(next);
        next = GetNextDlgTabItem(window, next, FALSE);
    }
    return round;
}

std::vector<HWND> ExpectedFocus(const TActionForm& form, const TFormWindow& window) {
    std::vector<HWND> round;
    for (const std::int32_t control : TabOrder(form.Design())) {
        const TFormControl& each = form.Design().controls[static_cast<std::size_t>(control)];
        const bool takes_focus = each.kind >= fcEdit && each.kind <= fcColorBox;
        if ((takes_focus || each.kind == fcButton) && form.State(control).enabled) {
            const char16_t* const name = each.name.c_str();
            round.push_back(each.kind == fcRadioGroup ? window.RadioItem(name, 0)
                                                      : window.Control(name));
        }
    }
    return round;
}

TEST_P(Win32Layout, NothingIsClippedAndTheFocusGoesInOrder) {
    if (!HasDisplay()) {
        GTEST_SKIP() << "there is no display to open windows on";
    }
    for (const TActionFormDesign* design : AllForms()) {
        TActionForm form(*design);
        TWin32User user;
        SCOPED_TRACE(Utf8FromUtf16(design->class_name));
        user.In(*design, [&](const TFormWindow& window) {
            RECT client{};
            GetClientRect(window.window, &client);
            // The system lets no sizeable window be larger than the screen.
            const std::int32_t width = ScaleLength(design->client_width, GetParam());
            EXPECT_TRUE(client.right == width || GetSystemMetrics(SM_CXSCREEN) < width);
            const std::int32_t height = ScaleLength(design->client_height, GetParam());
            EXPECT_TRUE(client.bottom == height || GetSystemMetrics(SM_CYSCREEN) < height);
            for (const TFormControl& control : design->controls) {
                ExpectUnclipped(window, control, GetParam());
            }
            EXPECT_EQ(FocusRound(window.window), ExpectedFocus(form, window));
            EXPECT_EQ(GetFocus(), ExpectedFocus(form, window).front());
        });
        user.Press(*design, u"btnCancel");
        std::u16string reason;
        EXPECT_TRUE(FormToolkitProvider()(reason)->ShowModal(form, {GetParam(), nullptr}, reason))
            << Utf8FromUtf16(reason);
        EXPECT_EQ(form.Result(), frCancel);
    }
}

INSTANTIATE_TEST_SUITE_P(Scales, Win32Layout, testing::Values(100, 150, 250));

TEST_F(Win32Forms, ALargerWindowGivesTheSampleItsRoom) {
    TActionForm form(TextOnImageForm());
    user.In(TextOnImageForm(), [](const TFormWindow& window) {
        const RECT before = PlaceOf(window.Control(u"panSample"));
        const RECT frame = PlaceOf(window.window);
        const auto resize = [&](int width, int height) {
            SetWindowPos(window.window, nullptr, 0, 0, width, height, SWP_NOMOVE | SWP_NOZORDER);
        };
        resize(frame.right - frame.left + 60, frame.bottom - frame.top + 40);
        const RECT after = PlaceOf(window.Control(u"panSample"));
        EXPECT_EQ(after.right - after.left, before.right - before.left + 60);
        EXPECT_EQ(after.bottom - after.top, before.bottom - before.top + 40);
        resize(10, 10);
        RECT client{};
        GetClientRect(window.window, &client);
        EXPECT_EQ(client.right, 404 - 16) << "smaller than the least size";
        EXPECT_EQ(client.bottom, 438 - 39);
    });
    user.Press(TextOnImageForm(), u"btnCancel");
    std::u16string reason;
    EXPECT_TRUE(FormToolkitProvider()(reason)->ShowModal(form, {100, nullptr}, reason));
}

}  // namespace
}  // namespace zm::test
