#pragma once

#include <windows.h>

#include <string>

#include "tests/views/formuser.h"

namespace zm::test {

inline HWND HandleOf(TWindow window) {
    return static_cast<HWND>(window);
}

inline HWND HandleOf(const TFormWindow& form, const char16_t* name, std::int32_t item = -1) {
    return HandleOf(form.Control(name, item));
}

inline std::u16string TextOf(HWND window) {
    std::u16string text(static_cast<std::size_t>(GetWindowTextLengthW(window)) + 1, u'\0');
    const int length = GetWindowTextW(window, reinterpret_cast<wchar_t*>(text.data()),
                                      static_cast<int>(text.size()));
    text.resize(static_cast<std::size_t>(length));
    return text;
}

/// Through the queue, as the keyboard's own.
inline void PressVirtualKey(HWND window, WPARAM key) {
    const HWND focus = GetFocus() == nullptr ? window : GetFocus();
    PostMessageW(focus, WM_KEYDOWN, key, 0);
    PostMessageW(focus, WM_KEYUP, key, static_cast<LPARAM>(0xC0000000));
}

/// Ends a dialog of the system.
inline void PressDialogButton(TUser& user, const std::u16string& title, int button) {
    user.In(title, [button](TWindow window) {
        PostMessageW(HandleOf(window), WM_COMMAND, MAKEWPARAM(button, BN_CLICKED),
                     reinterpret_cast<LPARAM>(GetDlgItem(HandleOf(window), button)));
    });
}

inline RECT PlaceOf(HWND window) {
    RECT place{};
    GetWindowRect(window, &place);
    return place;
}

}  // namespace zm::test
