#pragma once

#include <windows.h>

#include <cstdint>
#include <stdexcept>
#include <string>

#include "engine/foundation/zmdefs.h"

/// What the view asks of the system besides windows. Libraries of the common controls and dialogs
/// are bound when a form is shown, so that unattended jobs do not load them.
namespace zm {

static_assert(sizeof(wchar_t) == sizeof(char16_t));

/// Text as the system's calls take it; valid as long as `text`.
inline const wchar_t* WideText(const std::u16string& text) {
    return reinterpret_cast<const wchar_t*>(text.c_str());
}

inline std::u16string ModelText(const wchar_t* text) {
    return reinterpret_cast<const char16_t*>(text);
}

/// The module that this code is in: the plug-in, not the host.
HINSTANCE OwnModule();

/// Raises when the library or the function is missing.
FARPROC FindSystemFunction(const wchar_t* library, const char* name);

/// `SystemFunction<decltype(&ChooseColorW)>(L"comdlg32.dll", "ChooseColorW")`
template <typename TFunction>
TFunction SystemFunction(const wchar_t* library, const char* name) {
    return reinterpret_cast<TFunction>(reinterpret_cast<void*>(FindSystemFunction(library, name)));
}

/// While it lives, windows and libraries that the thread makes have the look of the system's
/// present theme, whatever look the host has asked for: the module's manifest is in force.
class TThemedScope {
public:
    TThemedScope();
    ~TThemedScope();
    TThemedScope(const TThemedScope&) = delete;
    TThemedScope& operator=(const TThemedScope&) = delete;

private:
    HANDLE context_;
    ULONG_PTR cookie_ = 0;
    bool active_ = false;
};

/// Whether somebody can see and answer a window of this process. A service has none, and a
/// dialog there would wait forever.
bool HasVisibleDesktop();

/// A stored colour on screen; a system colour has the user's present setting.
COLORREF ScreenColor(TColor color);

/// A GDI object with its end.
template <typename TObject>
class TGdiObject {
public:
    explicit TGdiObject(TObject object = nullptr) : object_(object) {}
    ~TGdiObject() { Reset(nullptr); }
    TGdiObject(const TGdiObject&) = delete;
    TGdiObject& operator=(const TGdiObject&) = delete;
    TObject Get() const { return object_; }
    void Reset(TObject object) {
        if (object_ != nullptr) {
            DeleteObject(object_);
        }
        object_ = object;
    }

private:
    TObject object_;
};

}  // namespace zm
