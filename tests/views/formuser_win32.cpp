#include <vector>

#include "actions/uActionFormLayout.h"
#include "actions/views/win32/uWin32FormIds.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstrings.h"
#include "tests/views/win32windows.h"

namespace zm::test {
namespace {

constexpr UINT kStepMilliseconds = 10;

UINT_PTR step_timer = 0;
std::function<void()> step_function;

const wchar_t* Wide(const std::u16string& text) {
    return reinterpret_cast<const wchar_t*>(text.c_str());
}

BOOL CALLBACK LookForDialog(HWND window, LPARAM found) {
    const bool is_dialog = IsWindowVisible(window) != FALSE && IsWindowEnabled(window) != FALSE &&
                           (GetWindowLongW(window, GWL_STYLE) & WS_CAPTION) == WS_CAPTION;
    *reinterpret_cast<HWND*>(found) = is_dialog ? window : nullptr;
    return is_dialog ? FALSE : TRUE;
}

/// The window on top of the thread's: enabled, shown and last opened.
HWND TopWindow() {
    HWND found = nullptr;
    EnumThreadWindows(GetCurrentThreadId(), &LookForDialog, reinterpret_cast<LPARAM>(&found));
    return found;
}

/// A message of a timer that has ended may still come.
void CALLBACK CallStep(HWND, UINT, UINT_PTR timer, DWORD) {
    if (timer == step_timer) {
        step_function();
    }
}

std::int32_t IndexOf(const TFormWindow& form, const TFormControl& control) {
    return static_cast<std::int32_t>(&control - form.design.controls.data());
}

/// Room that a control's text takes, without what the control draws around it.
SIZE TextRoom(HWND window, const std::u16string& text, int width) {
    const HDC device = GetDC(window);
    auto* const font = reinterpret_cast<HFONT>(SendMessageW(window, WM_GETFONT, 0, 0));
    const HGDIOBJ old_font = SelectObject(device, font);
    RECT place{0, 0, width, 0};
    DrawTextW(device, Wide(text), -1, &place,
              DT_CALCRECT | (width > 0 ? DT_WORDBREAK : DT_SINGLELINE));
    SelectObject(device, old_font);
    ReleaseDC(window, device);
    return {place.right, place.bottom};
}

void ExpectRoomFor(HWND window, const std::u16string& text, int mark_width) {
    RECT client{};
    GetClientRect(window, &client);
    const SIZE room = TextRoom(window, text, 0);
    EXPECT_GE(client.right, room.cx + mark_width);
    EXPECT_GE(client.bottom, room.cy);
}

void ExpectUnclipped(const TFormWindow& form, const TFormControl& control, int mark_width) {
    const char16_t* const name = control.name.c_str();
    SCOPED_TRACE(Utf8FromUtf16(name));
    const HWND window = HandleOf(form, name);
    RECT client{};
    GetClientRect(window, &client);
    switch (control.kind) {
        case fcLabel:
        case fcButton:
        case fcSpeedButton: ExpectRoomFor(window, TextOf(window), 0); break;
        case fcCheckBox: ExpectRoomFor(window, TextOf(window), mark_width); break;
        case fcEdit: ExpectRoomFor(window, u"Xg", 0); break;
        case fcWrappedLabel:
            EXPECT_GE(client.bottom, TextRoom(window, TextOf(window), client.right).cy);
            break;
        default: break;
    }
    for (std::size_t item = 0; item < control.items.size(); ++item) {
        if (control.kind == fcRadioGroup) {
            const HWND button = HandleOf(form, name, static_cast<std::int32_t>(item));
            ExpectRoomFor(button, TextOf(button), mark_width);
        } else if (control.kind == fcComboBox) {
            ExpectRoomFor(window, control.items[item], mark_width);
        }
    }
}

}  // namespace

bool HasDisplay() {
    const HWND window = CreateWindowExW(0, L"STATIC", L"", WS_POPUP, 0, 0, 1, 1, nullptr, nullptr,
                                        GetModuleHandleW(nullptr), nullptr);
    DestroyWindow(window);
    return window != nullptr;
}

TWindow WindowTitled(const std::u16string& title) {
    const HWND window = TopWindow();
    return window != nullptr && TextOf(window) == title ? window : nullptr;
}

void CallInLoops(std::function<void()> step) {
    if (step_timer != 0) {
        KillTimer(nullptr, step_timer);
        step_timer = 0;
    }
    step_function = std::move(step);
    if (step_function) {
        step_timer = SetTimer(nullptr, 0, kStepMilliseconds, &CallStep);
    }
}

void PressKey(TWindow window, TKey key) {
    PressVirtualKey(HandleOf(window), key == tkEnter ? VK_RETURN : VK_ESCAPE);
}

void PressCloseBox(TWindow window) {
    PostMessageW(HandleOf(window), WM_CLOSE, 0, 0);
}

TWindow TFormWindow::Control(const char16_t* name, std::int32_t item) const {
    const TFormControl& control = Declared(name);
    const std::int32_t index = IndexOf(*this, control);
    const HWND found = GetDlgItem(
        HandleOf(window), item < 0 ? ControlWindowId(control, index) : RadioItemId(index, item));
    EXPECT_NE(found, nullptr) << Utf8FromUtf16(name);
    return found;
}

std::u16string TFormWindow::Text(const char16_t* name) const {
    const std::u16string text = TextOf(HandleOf(*this, name));
    return Declared(name).kind == fcEdit ? text : PlainCaption(text);
}

bool TFormWindow::IsEnabled(const char16_t* name) const {
    return IsWindowEnabled(HandleOf(*this, name)) != FALSE;
}

std::int32_t TFormWindow::Chosen(const char16_t* name) const {
    return static_cast<std::int32_t>(SendMessageW(HandleOf(*this, name), CB_GETCURSEL, 0, 0));
}

bool TFormWindow::HasFocus(const char16_t* name) const {
    return GetFocus() == Control(name);
}

void TFormWindow::Focus(const char16_t* name) const {
    SetFocus(HandleOf(*this, name));
}

std::int32_t TFormWindow::Caret(const char16_t* edit) const {
    DWORD caret = 0;
    SendMessageW(HandleOf(*this, edit), EM_GETSEL, 0, reinterpret_cast<LPARAM>(&caret));
    return static_cast<std::int32_t>(caret);
}

void TFormWindow::PutCaret(const char16_t* edit, std::int32_t place) const {
    SendMessageW(HandleOf(*this, edit), EM_SETSEL, static_cast<WPARAM>(place), place);
}

void TFormWindow::Type(const char16_t* edit, const std::u16string& text) const {
    SendMessageW(HandleOf(*this, edit), EM_SETSEL, 0, -1);
    SendMessageW(HandleOf(*this, edit), EM_REPLACESEL, TRUE, reinterpret_cast<LPARAM>(Wide(text)));
}

void TFormWindow::Choose(const char16_t* name, std::int32_t item) const {
    if (Declared(name).kind == fcRadioGroup) {
        SendMessageW(HandleOf(*this, name, item), BM_CLICK, 0, 0);
        return;
    }
    // As the arrow keys do in a list that is closed.
    const HWND list = HandleOf(*this, name);
    SendMessageW(list, CB_SETCURSEL, static_cast<WPARAM>(item), 0);
    SendMessageW(HandleOf(window), WM_COMMAND, MAKEWPARAM(GetDlgCtrlID(list), CBN_SELCHANGE),
                 reinterpret_cast<LPARAM>(list));
}

void TFormWindow::Press(const char16_t* name) const {
    const HWND button = HandleOf(*this, name);
    if (Declared(name).kind != fcSpeedButton) {
        SendMessageW(button, BM_CLICK, 0, 0);
        return;
    }
    // It must not take the focus from the pointer's press.
    const LPARAM place = MAKELPARAM(5, 5);
    SendMessageW(button, WM_LBUTTONDOWN, MK_LBUTTON, place);
    SendMessageW(button, WM_LBUTTONUP, 0, place);
}

void TUser::CloseMessage(const std::u16string& title, const std::u16string& text) {
    In(title, [text](TWindow window) {
        const HWND box = HandleOf(window);
        HWND label = FindWindowExW(box, nullptr, L"Static", nullptr);
        while (label != nullptr && !TextOf(label).starts_with(text)) {
            label = FindWindowExW(box, label, L"Static", nullptr);
        }
        EXPECT_NE(label, nullptr) << "another message came, not: " << Utf8FromUtf16(text);
        EndDialog(box, IDOK);
    });
}

void TUser::Answer(const std::u16string& title, TAnswer answer) {
    constexpr int kButtons[] = {IDYES, IDNO, IDCANCEL};
    PressDialogButton(*this, title, kButtons[answer]);
}

/// The system lets no sizeable window be larger than the screen.
void ExpectFits(const TFormWindow& form, std::int32_t percent) {
    RECT client{};
    GetClientRect(HandleOf(form.window), &client);
    const std::int32_t width = ScaleLength(form.design.client_width, percent);
    EXPECT_TRUE(client.right == width || GetSystemMetrics(SM_CXSCREEN) < width);
    const std::int32_t height = ScaleLength(form.design.client_height, percent);
    EXPECT_TRUE(client.bottom == height || GetSystemMetrics(SM_CYSCREEN) < height);
    for (const TFormControl& control : form.design.controls) {
        ExpectUnclipped(form, control, 18 * percent / 100);
    }
}

bool HasKeyboard(TWindow) {
    return true;
}

std::vector<std::u16string> FocusRound(const TFormWindow& form) {
    const auto name_of = [&form](HWND window) {
        for (const TFormControl& control : form.design.controls) {
            const char16_t* const name = control.name.c_str();
            if (control.kind == fcRadioGroup && HandleOf(form, name, 0) == window) {
                return control.name + u"0";
            }
            if (HandleOf(form, name) == window) {
                return control.name;
            }
        }
        return std::u16string(u"?");
    };
    const HWND first = GetNextDlgTabItem(HandleOf(form.window), nullptr, FALSE);
    EXPECT_EQ(GetFocus(), first);
    std::vector<std::u16string> names{name_of(first)};
    HWND next = GetNextDlgTabItem(HandleOf(form.window), first, FALSE);
    while (next != nullptr && next != first && names.size() < 50) {
        names.push_back(name_of(next));
        next = GetNextDlgTabItem(HandleOf(form.window), next, FALSE);
    }
    return names;
}

void UseDialogFont(const std::string&) {}

bool SavePicture(TWindow window, const std::u16string& file_name) {
    RECT client{};
    GetClientRect(HandleOf(window), &client);
    const HDC device = GetDC(HandleOf(window));
    const HDC memory = CreateCompatibleDC(device);
    const HBITMAP copy = CreateCompatibleBitmap(device, client.right, client.bottom);
    const HGDIOBJ old = SelectObject(memory, copy);
    BitBlt(memory, 0, 0, client.right, client.bottom, device, 0, 0, SRCCOPY);
    SelectObject(memory, old);
    BITMAPINFO format{};
    format.bmiHeader = {
        sizeof(BITMAPINFOHEADER), client.right, client.bottom, 1, 24, 0, 0, 0, 0, 0, 0};
    std::vector<std::uint8_t> pixels(
        static_cast<std::size_t>((client.right * 3 + 3) / 4 * 4 * client.bottom));
    GetDIBits(memory, copy, 0, static_cast<UINT>(client.bottom), pixels.data(), &format,
              DIB_RGB_COLORS);
    DeleteDC(memory);
    DeleteObject(copy);
    ReleaseDC(HandleOf(window), device);
    TZmBitmap picture;
    return picture.CopyFromDIB(&format, sizeof(BITMAPINFOHEADER), pixels.data(),
                               static_cast<std::int64_t>(pixels.size())) &&
           picture.Write(file_name, nullptr);
}

}  // namespace zm::test
