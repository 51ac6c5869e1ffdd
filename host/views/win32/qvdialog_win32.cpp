#include "host/views/win32/qvdialog_win32_p.h"

#include <commctrl.h>

#include <algorithm>
#include <exception>
#include <iterator>
#include <stdexcept>

#include "engine/foundation/zmstrings.h"

namespace zm::qvrun {
namespace {

constexpr int kUnscaledPercent = 100;
constexpr int kMinButtonWidth = 86;
constexpr int kButtonPadding = 12;    ///< left and right of a caption
constexpr int kButtonRowPadding = 6;  ///< above and below it
constexpr int kColumnPadding = 14;    ///< left and right of a column's text, together
constexpr int kMaxColumnShare = 3;    ///< a column before the last has at most a third

/// A dialog template without controls; its menu, class and title are empty texts.
struct TEmptyTemplate {
    DLGTEMPLATE head{};
    WORD menu = 0;
    WORD window_class = 0;
    WORD title = 0;
};

std::runtime_error NoWindow() {
    return std::runtime_error("the system opens no window (error " +
                              std::to_string(GetLastError()) + ")");
}

/// Bound when a window is asked for, so that running jobs does not load the library.
void LoadCommonControls() {
    INITCOMMONCONTROLSEX classes{sizeof(INITCOMMONCONTROLSEX),
                                 ICC_STANDARD_CLASSES | ICC_LISTVIEW_CLASSES};
    SystemFunction<decltype(&InitCommonControlsEx)>(L"comctl32.dll",
                                                    "InitCommonControlsEx")(&classes);
}

RECT WorkArea(HWND owner) {
    MONITORINFO monitor{};
    monitor.cbSize = sizeof(monitor);
    GetMonitorInfoW(MonitorFromWindow(owner, MONITOR_DEFAULTTOPRIMARY), &monitor);
    return monitor.rcWork;
}

wchar_t* ItemText(const std::u16string& text) {
    return const_cast<wchar_t*>(WideText(text));  // the record serves reading, too
}

}  // namespace

void TRowList::Attach(HWND list, std::initializer_list<const char16_t*> titles) {
    list_ = list;
    SendMessageW(list, LVM_SETEXTENDEDLISTVIEWSTYLE, 0, LVS_EX_FULLROWSELECT | LVS_EX_DOUBLEBUFFER);
    for (const char16_t* title : titles) {
        const std::u16string text = title;
        LVCOLUMNW column{};
        column.mask = LVCF_TEXT | LVCF_SUBITEM;
        column.pszText = ItemText(text);
        column.iSubItem = columns_;
        SendMessageW(list, LVM_INSERTCOLUMNW, static_cast<WPARAM>(columns_++),
                     reinterpret_cast<LPARAM>(&column));
    }
}

void TRowList::SetRows(const std::vector<TRow>& rows) {
    SendMessageW(list_, WM_SETREDRAW, FALSE, 0);
    SendMessageW(list_, LVM_DELETEALLITEMS, 0, 0);
    for (int row = 0; row < static_cast<int>(rows.size()); ++row) {
        const TRow& texts = rows[static_cast<std::size_t>(row)];
        for (int column = 0; column < columns_; ++column) {
            LVITEMW item{};
            item.mask = LVIF_TEXT;
            item.iItem = row;
            item.iSubItem = column;
            item.pszText = ItemText(texts[static_cast<std::size_t>(column)]);
            SendMessageW(list_, column == 0 ? LVM_INSERTITEMW : LVM_SETITEMW, 0,
                         reinterpret_cast<LPARAM>(&item));
        }
    }
    FitColumns();
    SendMessageW(list_, WM_SETREDRAW, TRUE, 0);
    InvalidateRect(list_, nullptr, TRUE);
}

int TRowList::Count() const {
    return static_cast<int>(SendMessageW(list_, LVM_GETITEMCOUNT, 0, 0));
}

int TRowList::Chosen() const {
    return static_cast<int>(
        SendMessageW(list_, LVM_GETNEXTITEM, static_cast<WPARAM>(-1), LVNI_SELECTED));
}

void TRowList::Choose(int index) const {
    if (index < 0 || index >= Count()) {
        return;
    }
    LVITEMW item{};
    item.stateMask = LVIS_SELECTED | LVIS_FOCUSED;
    item.state = item.stateMask;
    const auto row = static_cast<WPARAM>(index);
    SendMessageW(list_, LVM_SETITEMSTATE, row, reinterpret_cast<LPARAM>(&item));
    SendMessageW(list_, LVM_ENSUREVISIBLE, row, FALSE);
}

void TRowList::FitColumns() const {
    RECT client{};
    GetClientRect(list_, &client);
    int left = client.right;
    for (int column = 0; column + 1 < columns_; ++column) {
        wchar_t title[64];
        LVCOLUMNW head{};
        head.mask = LVCF_TEXT;
        head.pszText = title;
        head.cchTextMax = static_cast<int>(std::size(title));
        const auto index = static_cast<WPARAM>(column);
        SendMessageW(list_, LVM_GETCOLUMNW, index, reinterpret_cast<LPARAM>(&head));
        const auto title_width = static_cast<int>(
            SendMessageW(list_, LVM_GETSTRINGWIDTHW, 0, reinterpret_cast<LPARAM>(title)));
        SendMessageW(list_, LVM_SETCOLUMNWIDTH, index, LVSCW_AUTOSIZE);
        const auto rows_width = static_cast<int>(SendMessageW(list_, LVM_GETCOLUMNWIDTH, index, 0));
        const int width = std::min(std::max(rows_width, title_width + kColumnPadding),
                                   static_cast<int>(client.right) / kMaxColumnShare);
        SendMessageW(list_, LVM_SETCOLUMNWIDTH, index, width);
        left -= width;
    }
    SendMessageW(list_, LVM_SETCOLUMNWIDTH, static_cast<WPARAM>(columns_ - 1), std::max(left, 0));
}

void TListDialog::Run(HWND owner) {
    const TThemedScope themed;
    LoadCommonControls();
    TEmptyTemplate design;
    design.head.style = WS_POPUP | WS_CAPTION | WS_SYSMENU | WS_THICKFRAME | WS_CLIPCHILDREN;
    if (owner == nullptr) {
        design.head.style |= WS_MINIMIZEBOX | WS_MAXIMIZEBOX;
    }
    DialogBoxIndirectParamW(OwnModule(), &design.head, owner, &DialogProc,
                            reinterpret_cast<LPARAM>(this));
    if (!opened_) {
        throw failure_.empty() ? NoWindow() : std::runtime_error(failure_);
    }
}

void TListDialog::Open() {
    font_.Reset(NewFormFont(kUnscaledPercent));
    const SIZE client = Build();
    Centre(client);
    opened_ = true;
    RECT size{};
    GetClientRect(window_, &size);
    PlaceControls(size.right, size.bottom);
    // In front of the console that the program was started from.
    ShowWindow(window_, SW_SHOW);
    SetForegroundWindow(window_);
}

void TListDialog::Close() {
    EndDialog(window_, 0);
}

SIZE TListDialog::WholeSize(SIZE client) const {
    RECT whole{0, 0, client.cx, client.cy};
    AdjustWindowRectEx(&whole, static_cast<DWORD>(GetWindowLongW(window_, GWL_STYLE)), FALSE,
                       static_cast<DWORD>(GetWindowLongW(window_, GWL_EXSTYLE)));
    return {whole.right - whole.left, whole.bottom - whole.top};
}

void TListDialog::Centre(SIZE client) {
    const HWND owner = GetWindow(window_, GW_OWNER);
    const RECT work = WorkArea(owner);
    RECT over = work;
    if (owner != nullptr && IsIconic(owner) == FALSE) {
        GetWindowRect(owner, &over);
    }
    const SIZE whole = WholeSize(client);
    const LONG width = std::min(whole.cx, work.right - work.left);
    const LONG height = std::min(whole.cy, work.bottom - work.top);
    const LONG left = over.left + (over.right - over.left - width) / 2;
    const LONG top = over.top + (over.bottom - over.top - height) / 2;
    Place(window_, std::clamp(left, work.left, work.right - width),
          std::clamp(top, work.top, work.bottom - height), width, height);
}

HWND TListDialog::AddControl(const wchar_t* window_class, DWORD style, const std::u16string& text,
                             int id) {
    const HWND control = CreateWindowExW(
        0, window_class, WideText(text), WS_CHILD | WS_VISIBLE | WS_CLIPSIBLINGS | style, 0, 0, 0,
        0, window_, reinterpret_cast<HMENU>(static_cast<INT_PTR>(id)), OwnModule(), nullptr);
    if (control == nullptr) {
        throw NoWindow();
    }
    SendMessageW(control, WM_SETFONT, reinterpret_cast<WPARAM>(font_.Get()), FALSE);
    return control;
}

HWND TListDialog::AddButton(const std::u16string& caption, int id) {
    return AddControl(WC_BUTTONW, WS_TABSTOP | BS_PUSHBUTTON, caption, id);
}

HWND TListDialog::AddList(int id) {
    constexpr DWORD kListStyle = LVS_REPORT | LVS_SINGLESEL | LVS_SHOWSELALWAYS | LVS_NOSORTHEADER;
    return AddControl(WC_LISTVIEWW, WS_TABSTOP | WS_BORDER | kListStyle, u"", id);
}

SIZE TListDialog::TextSize(const std::u16string& text, int width) const {
    const HDC device = GetDC(window_);
    const HGDIOBJ old = SelectObject(device, font_.Get());
    RECT room{0, 0, width, 0};
    const UINT wrap = width > 0 ? DT_WORDBREAK | DT_EDITCONTROL : 0;
    DrawTextW(device, WideText(text), -1, &room, DT_CALCRECT | wrap);
    SelectObject(device, old);
    ReleaseDC(window_, device);
    return {room.right, room.bottom};
}

SIZE TListDialog::ButtonSize(std::initializer_list<HWND> buttons) const {
    SIZE largest{kMinButtonWidth, 0};
    for (const HWND button : buttons) {
        const SIZE caption = TextSize(WindowText(button));
        largest.cx = std::max(largest.cx, caption.cx + 2 * kButtonPadding);
        largest.cy = std::max(largest.cy, caption.cy + 2 * kButtonRowPadding);
    }
    return largest;
}

void TListDialog::Focus(HWND control) const {
    SendMessageW(window_, WM_NEXTDLGCTL, reinterpret_cast<WPARAM>(control), TRUE);
}

void TListDialog::Enable(HWND control, bool enabled, HWND next_focus) const {
    // The keyboard would be lost on a window that takes no input.
    if (!enabled && GetFocus() == control) {
        Focus(next_focus);
    }
    EnableWindow(control, enabled ? TRUE : FALSE);
}

INT_PTR TListDialog::HandleMessage(UINT message, WPARAM wparam, LPARAM lparam) {
    switch (message) {
        case WM_INITDIALOG: Open(); return FALSE;  // the focus is set
        case WM_COMMAND:
            // Whatever comes while another window is waited for would come out of turn.
            if (HIWORD(wparam) == BN_CLICKED && IsWindowEnabled(window_) != FALSE) {
                OnCommand(LOWORD(wparam));
            }
            return TRUE;
        case WM_NOTIFY: OnNotify(*reinterpret_cast<const NMHDR*>(lparam)); return FALSE;
        case WM_SIZE:
            if (opened_ && wparam != SIZE_MINIMIZED) {
                PlaceControls(LOWORD(lparam), HIWORD(lparam));
            }
            return TRUE;
        case WM_GETMINMAXINFO:
            if (opened_) {
                const SIZE smallest = WholeSize(SmallestClient());
                reinterpret_cast<MINMAXINFO*>(lparam)->ptMinTrackSize = {smallest.cx, smallest.cy};
            }
            return TRUE;
        case WM_CTLCOLORSTATIC:
            return reinterpret_cast<INT_PTR>(
                LabelBackground(reinterpret_cast<HWND>(lparam), reinterpret_cast<HDC>(wparam)));
        default: return FALSE;
    }
}

INT_PTR CALLBACK TListDialog::DialogProc(HWND window, UINT message, WPARAM wparam, LPARAM lparam) {
    if (message == WM_INITDIALOG) {
        SetWindowLongPtrW(window, DWLP_USER, lparam);
        reinterpret_cast<TListDialog*>(lparam)->window_ = window;
    }
    auto* const dialog = reinterpret_cast<TListDialog*>(GetWindowLongPtrW(window, DWLP_USER));
    if (dialog == nullptr) {
        return FALSE;  // messages of the window's making
    }
    // No exception may cross the system's frames below.
    try {
        return dialog->HandleMessage(message, wparam, lparam);
    } catch (const std::exception& error) {
        if (dialog->opened_) {
            Tell(window, MB_ICONERROR, Utf16FromUtf8(error.what()));
        } else {
            dialog->failure_ = error.what();
            EndDialog(window, 0);
        }
    }
    return FALSE;
}

void Tell(HWND owner, UINT icon, const std::u16string& text) {
    MessageBoxW(owner, WideText(text), kMessageTitle, MB_OK | icon);
}

}  // namespace zm::qvrun
