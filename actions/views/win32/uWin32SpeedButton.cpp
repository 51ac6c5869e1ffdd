#include "actions/views/win32/uWin32SpeedButton_p.h"

#include <algorithm>
#include <array>

#include "actions/views/win32/uWin32System_p.h"

/// The standard button takes the focus with the mouse, and with it the caret out of the edit that
/// a variable is meant for. This one draws itself and lets the focus be.
namespace zm {
namespace {

// Extra words of each window.
constexpr int kStateSlot = 0;
constexpr int kFontSlot = sizeof(LONG_PTR);

enum TButtonState : std::uint8_t { bsHot = 1, bsPressed = 2 };

LONG StateOf(HWND button) {
    return GetWindowLongW(button, kStateSlot);
}

void PutState(HWND button, LONG state) {
    if (StateOf(button) != state) {
        SetWindowLongW(button, kStateSlot, state);
        InvalidateRect(button, nullptr, FALSE);
    }
}

/// `place` as the pointer's messages have it; outside of the window it may be negative.
bool IsInside(HWND button, LPARAM place) {
    RECT client{};
    GetClientRect(button, &client);
    const POINT point{static_cast<short>(LOWORD(place)), static_cast<short>(HIWORD(place))};
    return PtInRect(&client, point) != FALSE;
}

void TellClick(HWND button) {
    if (IsWindowEnabled(button) != FALSE) {
        SendMessageW(GetParent(button), WM_COMMAND, MAKEWPARAM(GetDlgCtrlID(button), BN_CLICKED),
                     reinterpret_cast<LPARAM>(button));
    }
}

/// Raised below the pointer, sunken while it presses.
void FollowPointer(HWND button, LPARAM place) {
    const bool inside = IsInside(button, place);
    const bool captured = GetCapture() == button;
    PutState(button, (inside ? bsHot : 0) | (inside && captured ? bsPressed : 0));
    TRACKMOUSEEVENT track{sizeof(TRACKMOUSEEVENT), TME_LEAVE, button, 0};
    TrackMouseEvent(&track);
}

/// A press that is let go outside is none.
void Release(HWND button, LPARAM place) {
    const bool clicked = GetCapture() == button && IsInside(button, place);
    ReleaseCapture();
    if (clicked) {
        TellClick(button);
    }
}

void Draw(HWND button, HDC device) {
    RECT client{};
    GetClientRect(button, &client);
    FillRect(device, &client, GetSysColorBrush(COLOR_BTNFACE));
    const LONG state = StateOf(button);
    if (state != 0) {
        DrawEdge(device, &client, (state & bsPressed) != 0 ? BDR_SUNKENOUTER : BDR_RAISEDINNER,
                 BF_RECT);
    }
    std::array<wchar_t, 32> caption{};
    const int length = GetWindowTextW(button, caption.data(), static_cast<int>(caption.size()));
    auto* const font = reinterpret_cast<HFONT>(GetWindowLongPtrW(button, kFontSlot));
    const HGDIOBJ old_font = SelectObject(device, font);
    SetBkMode(device, TRANSPARENT);
    SetTextColor(device,
                 GetSysColor(IsWindowEnabled(button) != FALSE ? COLOR_BTNTEXT : COLOR_GRAYTEXT));
    DrawTextW(device, caption.data(), length, &client, DT_CENTER | DT_VCENTER | DT_SINGLELINE);
    SelectObject(device, old_font);
}

void Paint(HWND button) {
    PAINTSTRUCT paint{};
    const HDC device = BeginPaint(button, &paint);
    Draw(button, device);
    EndPaint(button, &paint);
}

LRESULT CALLBACK SpeedButtonProc(HWND button, UINT message, WPARAM wparam, LPARAM lparam) {
    switch (message) {
        case WM_LBUTTONDOWN:
        case WM_LBUTTONDBLCLK:
            SetCapture(button);
            FollowPointer(button, lparam);
            return 0;
        case WM_MOUSEMOVE: FollowPointer(button, lparam); return 0;
        case WM_LBUTTONUP: Release(button, lparam); return 0;
        // Another window has taken the pointer in the midst of a press.
        case WM_CAPTURECHANGED: PutState(button, StateOf(button) & ~bsPressed); return 0;
        case WM_MOUSELEAVE: PutState(button, 0); return 0;
        case BM_CLICK: TellClick(button); return 0;
        case WM_SETFONT:
            SetWindowLongPtrW(button, kFontSlot, static_cast<LONG_PTR>(wparam));
            InvalidateRect(button, nullptr, FALSE);
            return 0;
        case WM_GETFONT: return GetWindowLongPtrW(button, kFontSlot);
        case WM_GETDLGCODE: return DLGC_STATIC;  // nothing for the dialog's keys
        case WM_ENABLE: InvalidateRect(button, nullptr, FALSE); return 0;
        case WM_ERASEBKGND: return TRUE;
        case WM_PAINT: Paint(button); return 0;
        case WM_PRINTCLIENT: Draw(button, reinterpret_cast<HDC>(wparam)); return 0;
        default: return DefWindowProcW(button, message, wparam, lparam);
    }
}

}  // namespace

TSpeedButtonClass::TSpeedButtonClass() {
    WNDCLASSW window_class{};
    window_class.style = CS_DBLCLKS | CS_HREDRAW | CS_VREDRAW;
    window_class.lpfnWndProc = &SpeedButtonProc;
    window_class.cbWndExtra = kFontSlot + static_cast<int>(sizeof(LONG_PTR));
    window_class.hInstance = OwnModule();
    window_class.hCursor = LoadCursorW(nullptr, reinterpret_cast<const wchar_t*>(IDC_ARROW));
    window_class.lpszClassName = kSpeedButtonClass;
    RegisterClassW(&window_class);  // a form that is open already has registered it
}

TSpeedButtonClass::~TSpeedButtonClass() {
    UnregisterClassW(kSpeedButtonClass, OwnModule());  // refused while another form uses it
}

}  // namespace zm
