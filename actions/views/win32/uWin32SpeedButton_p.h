#pragma once

#include <windows.h>

namespace zm {

inline constexpr wchar_t kSpeedButtonClass[] = L"ZmSpeedButton";

/// Registers the window class of flat buttons that never take the focus; they tell their parent
/// of a click like the system's buttons. Windows of the class end before the object does. The
/// class must not outlive the module that its code is in.
class TSpeedButtonClass {
public:
    TSpeedButtonClass();
    ~TSpeedButtonClass();
    TSpeedButtonClass(const TSpeedButtonClass&) = delete;
    TSpeedButtonClass& operator=(const TSpeedButtonClass&) = delete;
};

}  // namespace zm
