#pragma once

#include <gtest/gtest.h>
#include <windows.h>

#include <cstdint>
#include <deque>
#include <functional>
#include <string>
#include <utility>

#include "actions/uActionFormModel.h"
#include "actions/views/win32/uWin32FormIds.h"

/// A user of real windows: does one act after the other, each when its window is there.
namespace zm::test {

/// The window on top of the thread's: enabled, shown and last opened.
inline HWND TopWindow() {
    struct TSearch {
        HWND found = nullptr;
        static BOOL CALLBACK Look(HWND window, LPARAM data) {
            const bool is_dialog = IsWindowVisible(window) != FALSE &&
                                   IsWindowEnabled(window) != FALSE &&
                                   (GetWindowLongW(window, GWL_STYLE) & WS_CAPTION) == WS_CAPTION;
            auto& search = *reinterpret_cast<TSearch*>(data);
            search.found = search.found == nullptr && is_dialog ? window : search.found;
            return TRUE;
        }
    } search;
    EnumThreadWindows(GetCurrentThreadId(), &TSearch::Look, reinterpret_cast<LPARAM>(&search));
    return search.found;
}

inline std::u16string TextOf(HWND window) {
    std::u16string text(static_cast<std::size_t>(GetWindowTextLengthW(window)) + 1, u'\0');
    const int length = GetWindowTextW(window, reinterpret_cast<wchar_t*>(text.data()),
                                      static_cast<int>(text.size()));
    text.resize(static_cast<std::size_t>(length));
    return text;
}

/// A form's window and its controls by their names.
struct TFormWindow {
    HWND window;
    const TActionFormDesign& design;

    std::int32_t IndexOf(const char16_t* name) const {
        std::int32_t index = 0;
        for (const TFormControl& control : design.controls) {
            if (control.name == name) {
                return index;
            }
            ++index;
        }
        ADD_FAILURE() << "no such control";
        return 0;
    }
    HWND Control(const char16_t* name) const {
        const std::int32_t index = IndexOf(name);
        return GetDlgItem(window,
                          ControlWindowId(design.controls[static_cast<std::size_t>(index)], index));
    }
    HWND RadioItem(const char16_t* name, std::int32_t item) const {
        return GetDlgItem(window, RadioItemId(IndexOf(name), item));
    }
    std::u16string Text(const char16_t* name) const { return TextOf(Control(name)); }
    bool IsEnabled(const char16_t* name) const { return IsWindowEnabled(Control(name)) != FALSE; }

    void Type(const char16_t* name, const std::u16string& text) const {
        const HWND edit = Control(name);
        SendMessageW(edit, EM_SETSEL, 0, -1);
        SendMessageW(edit, EM_REPLACESEL, TRUE, reinterpret_cast<LPARAM>(text.c_str()));
    }
    /// As the arrow keys do in a list that is closed.
    void Choose(const char16_t* name, int item) const {
        const HWND list = Control(name);
        SendMessageW(list, CB_SETCURSEL, static_cast<WPARAM>(item), 0);
        SendMessageW(window, WM_COMMAND, MAKEWPARAM(GetDlgCtrlID(list), CBN_SELCHANGE),
                     reinterpret_cast<LPARAM>(list));
    }
    void Press(const char16_t* name) const { SendMessageW(Control(name), BM_CLICK, 0, 0); }
    void Click(const char16_t* name) const {
        const LPARAM place = MAKELPARAM(5, 5);
        SendMessageW(Control(name), WM_LBUTTONDOWN, MK_LBUTTON, place);
        SendMessageW(Control(name), WM_LBUTTONUP, 0, place);
    }
    /// Through the queue, as the keyboard's own.
    void Key(WPARAM key) const {
        const HWND focus = GetFocus() == nullptr ? window : GetFocus();
        PostMessageW(focus, WM_KEYDOWN, key, 0);
        PostMessageW(focus, WM_KEYUP, key, static_cast<LPARAM>(0xC0000000));
    }
};

class TWin32User {
public:
    /// True when the act is done, False to be asked again.
    using TAct = std::function<bool(HWND window)>;

    TWin32User() {
        current_ = this;
        timer_ = SetTimer(nullptr, 0, USER_TIMER_MINIMUM, &Step);
    }
    ~TWin32User() {
        KillTimer(nullptr, timer_);
        current_ = nullptr;
        EXPECT_TRUE(acts_.empty()) << "not all acts were done";
    }
    TWin32User(const TWin32User&) = delete;
    TWin32User& operator=(const TWin32User&) = delete;

    /// In a window of this title.
    void WhenReady(const std::u16string& title, TAct act) {
        acts_.emplace_back(title, std::move(act));
    }
    void In(const TActionFormDesign& design, std::function<void(const TFormWindow&)> act) {
        WhenReady(design.caption, [&design, act = std::move(act)](HWND window) {
            act(TFormWindow{window, design});
            return true;
        });
    }
    void Press(const TActionFormDesign& design, const char16_t* button) {
        In(design, [button](const TFormWindow& form) { form.Press(button); });
    }
    /// Ends a dialog of the system.
    void Answer(const std::u16string& title, int button) {
        WhenReady(title, [button](HWND window) {
            PostMessageW(window, WM_COMMAND, MAKEWPARAM(button, BN_CLICKED),
                         reinterpret_cast<LPARAM>(GetDlgItem(window, button)));
            return true;
        });
    }

private:
    /// An act may open a dialog and with it another message loop, in which the next acts come.
    static void CALLBACK Step(HWND, UINT, UINT_PTR, DWORD) {
        if (current_ == nullptr || current_->acts_.empty()) {
            return;
        }
        const HWND window = TopWindow();
        if (window == nullptr || TextOf(window) != current_->acts_.front().first) {
            current_->GiveUpLate(window);
            return;
        }
        auto act = std::move(current_->acts_.front());
        current_->acts_.pop_front();
        current_->waits_ = 0;
        if (!act.second(window)) {
            current_->acts_.push_front(std::move(act));
        }
    }
    /// A window that never comes must not keep the test from ending.
    void GiveUpLate(HWND window) {
        constexpr int kMaxWaits = 2000;  // some twenty seconds
        if (++waits_ > kMaxWaits && window != nullptr) {
            ADD_FAILURE() << "another window came, number " << acts_.size() << " from the end";
            PostMessageW(window, WM_COMMAND, IDCANCEL, 0);
            waits_ -= kMaxWaits / 10;
        }
    }

    inline static TWin32User* current_ = nullptr;
    UINT_PTR timer_ = 0;
    int waits_ = 0;
    std::deque<std::pair<std::u16string, TAct>> acts_;
};

/// Whether windows can be shown here.
inline bool HasDisplay() {
    const HWND window = CreateWindowExW(0, L"STATIC", L"", WS_POPUP, 0, 0, 1, 1, nullptr, nullptr,
                                        GetModuleHandleW(nullptr), nullptr);
    DestroyWindow(window);
    return window != nullptr;
}

}  // namespace zm::test
