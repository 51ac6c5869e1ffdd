#include <algorithm>
#include <exception>

#include "actions/uActionFormLayout.h"
#include "actions/views/uFormViewParts_p.h"
#include "actions/views/win32/uWin32FormView_p.h"
#include "engine/foundation/zmstrings.h"

/// What the user does in a form's window.
namespace zm {
namespace {

/// Posted to the dialog when a choice in a colour box was made, because the list is still open.
constexpr UINT kColorChosenMessage = WM_APP + 1;

/// The caret of an edit, in UTF-16 units. It stands at either end of the selected text.
std::int32_t CaretOf(HWND edit) {
    DWORD start = 0;
    DWORD end = 0;
    SendMessageW(edit, EM_GETSEL, reinterpret_cast<WPARAM>(&start), reinterpret_cast<LPARAM>(&end));
    POINT caret{};
    const LRESULT start_place = SendMessageW(edit, EM_POSFROMCHAR, start, 0);
    const bool at_start = GetCaretPos(&caret) != FALSE && start_place != -1 &&
                          static_cast<short>(LOWORD(start_place)) == caret.x;
    return static_cast<std::int32_t>(at_start ? start : end);
}

}  // namespace

void TWin32FormView::OnCommand(HWND window, int id, int code) {
    if (id == IDOK || id == IDCANCEL) {
        // From the keyboard too, and from the close box.
        PressFormButton(form_, id == IDOK ? fbOk : fbCancel);
        return;
    }
    const std::int32_t control = ControlOf(window);
    if (control < 0 || syncing_ != 0) {
        return;
    }
    switch (Control(control).kind) {
        case fcEdit:
            if (code == EN_CHANGE) {
                OnEditChanged(control);
            }
            break;
        case fcComboBox:
        case fcColorBox: OnListEvent(control, code); break;
        default:
            if (code == BN_CLICKED) {
                OnButtonClicked(control, window);
            }
            break;
    }
}

void TWin32FormView::OnEditChanged(std::int32_t control) {
    form_.SetText(control, WindowText(Windows(control).main));
}

/// A list's choice counts at once; a colour box's only when it is confirmed, because its first
/// item opens a picker.
void TWin32FormView::OnListEvent(std::int32_t control, int code) {
    const HWND list = Windows(control).main;
    if (Control(control).kind == fcComboBox) {
        // An open list may close without a word about the item that it went back to.
        if (code == CBN_SELCHANGE || code == CBN_CLOSEUP) {
            form_.SetIndex(control,
                           static_cast<std::int32_t>(SendMessageW(list, CB_GETCURSEL, 0, 0)));
        }
        return;
    }
    const bool moved_closed =
        code == CBN_SELCHANGE && SendMessageW(list, CB_GETDROPPEDSTATE, 0, 0) == FALSE;
    if (code != CBN_SELENDOK && code != CBN_SELENDCANCEL && !moved_closed) {
        return;
    }
    // More than one of these may come for one choice; the last one tells.
    color_confirmed_ = code != CBN_SELENDCANCEL;
    if (pending_color_box_ < 0) {
        pending_color_box_ = control;
        PostMessageW(window_, kColorChosenMessage, static_cast<WPARAM>(control), 0);
    }
}

void TWin32FormView::OnColorChosen(std::int32_t control) {
    pending_color_box_ = -1;
    if (!color_confirmed_) {
        ControlChanged(control, fchIndex);
        return;
    }
    const LRESULT index = SendMessageW(Windows(control).main, CB_GETCURSEL, 0, 0);
    form_.SetIndex(control, static_cast<std::int32_t>(index));
}

/// Clicks of all windows of the system's button class, radio buttons and check boxes among them.
void TWin32FormView::OnButtonClicked(std::int32_t control, HWND window) {
    const TControlWindows& windows = Windows(control);
    switch (Control(control).kind) {
        case fcRadioGroup: {
            const auto item = std::find(windows.items.begin(), windows.items.end(), window);
            form_.SetIndex(control, static_cast<std::int32_t>(item - windows.items.begin()));
            break;
        }
        case fcCheckBox:
            form_.SetChecked(control, SendMessageW(window, BM_GETCHECK, 0, 0) == BST_CHECKED);
            break;
        case fcSpeedButton: InsertVariable(); break;
        case fcButton: form_.PressButton(control); break;
        default: break;
    }
}

void TWin32FormView::InsertVariable() {
    const HWND focus = GetFocus();
    const std::int32_t active = ControlOf(focus);
    const bool is_edit = active >= 0 && Control(active).kind == fcEdit;
    const std::int32_t caret = is_edit ? CaretOf(focus) : 0;
    const std::int32_t new_caret = form_.PressInsertVariable(active, caret);
    if (is_edit && form_.Result() == frNone) {
        // The window in which the host let a variable be picked may have left the focus elsewhere.
        if (GetFocus() != focus) {
            SetFocus(focus);
        }
        if (new_caret != caret) {
            SendMessageW(focus, EM_SETSEL, static_cast<WPARAM>(new_caret), new_caret);
            SendMessageW(focus, EM_SCROLLCARET, 0, 0);
        }
    }
}

/// The help key asks the host's main window, as the system's own controls ask their parents: the
/// page is the context of the request.
void TWin32FormView::SendHelp() {
    if (main_window_ == nullptr) {
        return;
    }
    HELPINFO help{};
    help.cbSize = sizeof(help);
    help.iContextType = HELPINFO_WINDOW;
    help.iCtrlId = GetDlgCtrlID(GetFocus());
    help.hItemHandle = window_;
    help.dwContextId = static_cast<DWORD_PTR>(form_.Design().help_context);
    GetCursorPos(&help.MousePos);
    SendMessageW(main_window_, WM_HELP, 0, reinterpret_cast<LPARAM>(&help));
}

/// Fields have the background of their state; all else is the system's.
INT_PTR TWin32FormView::OnControlColor(HDC device, HWND window) {
    const std::int32_t control = ControlOf(window);
    if (control < 0 || (Control(control).kind != fcEdit && Control(control).kind != fcComboBox)) {
        return FALSE;
    }
    const TFormControlState& state = form_.State(control);
    const int background = state.background & 0xFF;
    SetTextColor(device, GetSysColor(state.enabled ? COLOR_WINDOWTEXT : COLOR_GRAYTEXT));
    SetBkColor(device, GetSysColor(background));
    return reinterpret_cast<INT_PTR>(GetSysColorBrush(background));
}

void TWin32FormView::OnDrawItem(const DRAWITEMSTRUCT& draw) {
    const std::int32_t control = ControlOf(draw.hwndItem);
    if (control < 0) {
        return;
    }
    if (Control(control).kind == fcColorBox) {
        DrawColorItem(draw, Control(control), form_.State(control));
    } else if (Control(control).kind == fcSamplePanel) {
        DrawSample(draw, form_.State(control));
    }
}

INT_PTR TWin32FormView::HandleMessage(UINT message, WPARAM wparam, LPARAM lparam) {
    switch (message) {
        case WM_INITDIALOG: Open(); return FALSE;  // the focus is set
        case WM_COMMAND:
            OnCommand(reinterpret_cast<HWND>(lparam), LOWORD(wparam), HIWORD(wparam));
            return TRUE;
        case kColorChosenMessage: OnColorChosen(static_cast<std::int32_t>(wparam)); return TRUE;
        case WM_HELP: SendHelp(); return TRUE;
        case WM_NCDESTROY:  // by the host, when it ends in the midst
            window_ = nullptr;
            WakeLoop();
            return FALSE;
        case WM_SIZE:
            if (opened_ && wparam != SIZE_MINIMIZED) {
                PlaceControls();
            }
            return TRUE;
        case WM_GETMINMAXINFO: {
            const SIZE smallest = SmallestWindow();
            reinterpret_cast<MINMAXINFO*>(lparam)->ptMinTrackSize = {smallest.cx, smallest.cy};
            return TRUE;
        }
        case WM_CTLCOLOREDIT:
        case WM_CTLCOLORLISTBOX:
        case WM_CTLCOLORSTATIC:
            return OnControlColor(reinterpret_cast<HDC>(wparam), reinterpret_cast<HWND>(lparam));
        case WM_DRAWITEM: OnDrawItem(*reinterpret_cast<DRAWITEMSTRUCT*>(lparam)); return TRUE;
        default: return FALSE;
    }
}

/// The system's way in: finds the view of a window.
INT_PTR CALLBACK TWin32FormView::DialogProc(HWND window, UINT message, WPARAM wparam,
                                            LPARAM lparam) {
    if (message == WM_INITDIALOG) {
        SetWindowLongPtrW(window, DWLP_USER, lparam);
        reinterpret_cast<TWin32FormView*>(lparam)->window_ = window;
    }
    auto* const view = reinterpret_cast<TWin32FormView*>(GetWindowLongPtrW(window, DWLP_USER));
    if (view == nullptr) {
        return FALSE;  // messages of the window's making
    }
    // No exception may cross the system's frames below.
    try {
        return view->HandleMessage(message, wparam, lparam);
    } catch (const std::exception& error) {
        if (!view->opened_) {
            view->failure_ = Utf16FromUtf8(error.what());
        } else {
            MessageBoxA(window, error.what(), nullptr, MB_OK | MB_ICONERROR);
        }
    }
    return FALSE;
}

}  // namespace zm
