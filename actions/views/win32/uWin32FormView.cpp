#include "actions/views/win32/uWin32FormView_p.h"

#include <commctrl.h>

#include <algorithm>

#include "actions/uActionFormLayout.h"
#include "actions/views/uFormViewParts_p.h"

/// The dialog itself: its making, places and states. What its user does is in
/// uWin32FormEvents.cpp.
namespace zm {
namespace {

/// Above and below the text of an edit or list, frame included.
constexpr std::int32_t kFieldPadding = 4;
/// Frame around the chosen item of a list.
constexpr std::int32_t kListFrame = 3;
constexpr std::int32_t kListedItems = 10;

/// A dialog template without controls; its menu, class and title are empty texts. The system reads
/// it as one run of words that begins at a double word.
struct alignas(DWORD) TEmptyTemplate {
    DLGTEMPLATE head{};
    WORD menu = 0;
    WORD window_class = 0;
    WORD title = 0;
};
static_assert(sizeof(TEmptyTemplate) == sizeof(DLGTEMPLATE) + 3 * sizeof(WORD));

/// Frames of a form that keeps its size and of one that the user can resize.
DWORD WindowStyle(TFormBorder border) {
    const DWORD style = WS_POPUP | WS_CAPTION | WS_SYSMENU;
    return border == fbsSizeable ? style | WS_THICKFRAME | WS_MAXIMIZEBOX : style | DS_MODALFRAME;
}

/// What the window's own frame and title add to its client area.
SIZE FrameSize(HWND window) {
    RECT frame{};
    AdjustWindowRectEx(&frame, static_cast<DWORD>(GetWindowLongW(window, GWL_STYLE)), FALSE,
                       static_cast<DWORD>(GetWindowLongW(window, GWL_EXSTYLE)));
    return {frame.right - frame.left, frame.bottom - frame.top};
}

/// Where a window of this size is centred over the main one, or on its screen when that does not
/// show; all of it on the screen, or its title where the screen is smaller.
POINT CentredPlace(HWND main_window, SIZE size) {
    MONITORINFO monitor{};
    monitor.cbSize = sizeof(monitor);
    GetMonitorInfoW(MonitorFromWindow(main_window, MONITOR_DEFAULTTOPRIMARY), &monitor);
    const RECT& work = monitor.rcWork;
    RECT over{};
    const bool shows = main_window != nullptr && IsWindowVisible(main_window) != FALSE &&
                       IsIconic(main_window) == FALSE &&
                       GetWindowRect(main_window, &over) != FALSE && IsRectEmpty(&over) == FALSE;
    if (!shows) {
        over = work;
    }
    const auto place = [](LONG from, LONG to, LONG length, LONG low, LONG high) {
        const LONG centred = from + (to - from - length) / 2;
        return std::max(low, std::min(centred, high - length));
    };
    return {place(over.left, over.right, size.cx, work.left, work.right),
            place(over.top, over.bottom, size.cy, work.top, work.bottom)};
}

/// Hosts may give a window that has gone, or one inside of their main window.
HWND ValidMainWindow(void* handle) {
    const auto window = static_cast<HWND>(handle);
    return window != nullptr && IsWindow(window) != FALSE ? GetAncestor(window, GA_ROOT) : nullptr;
}

}  // namespace

BOOL CALLBACK TOtherWindows::DisableOne(HWND window, LPARAM others) {
    auto& self = *reinterpret_cast<TOtherWindows*>(others);
    if (window != self.dialog_ && IsWindowVisible(window) != FALSE &&
        IsWindowEnabled(window) != FALSE) {
        self.disabled_.push_back(window);
        EnableWindow(window, FALSE);
    }
    return TRUE;
}

void TOtherWindows::Disable(HWND dialog, HWND main_window) {
    dialog_ = dialog;
    EnumThreadWindows(GetCurrentThreadId(), &DisableOne, reinterpret_cast<LPARAM>(this));
    if (main_window != nullptr) {
        DisableOne(main_window, reinterpret_cast<LPARAM>(this));  // it may be another thread's
    }
}

void TOtherWindows::Enable() {
    for (const HWND window : disabled_) {
        EnableWindow(window, TRUE);
    }
    disabled_.clear();
}

TWin32FormView::TWin32FormView(IActionForm& form, const TFormShowOptions& options)
    : form_(form),
      scale_(options.scale_percent),
      main_window_(ValidMainWindow(options.main_window)),
      windows_(form.Design().controls.size()) {}

TWin32FormView::~TWin32FormView() {
    form_.AttachView(nullptr);
}

const TFormControl& TWin32FormView::Control(std::int32_t control) const {
    return form_.Design().controls[static_cast<std::size_t>(control)];
}

TControlWindows& TWin32FormView::Windows(std::int32_t control) {
    return windows_[static_cast<std::size_t>(control)];
}

std::int32_t TWin32FormView::ControlOf(HWND window) const {
    for (std::size_t index = 0; index < windows_.size(); ++index) {
        const std::vector<HWND>& items = windows_[index].items;
        const bool is_item = std::find(items.begin(), items.end(), window) != items.end();
        if (window != nullptr && (windows_[index].main == window || is_item)) {
            return static_cast<std::int32_t>(index);
        }
    }
    return -1;
}

bool TWin32FormView::Run(std::u16string& reason) {
    TEmptyTemplate design;
    design.head.style = WindowStyle(form_.Design().border);
    const HWND active = GetActiveWindow();
    CreateDialogIndirectParamW(OwnModule(), &design.head,
                               main_window_ != nullptr ? main_window_ : active, &DialogProc,
                               reinterpret_cast<LPARAM>(this));
    if (opened_) {
        others_.Disable(window_, main_window_);
        ShowWindow(window_, SW_SHOW);
        RunMessages();
    } else {
        reason = failure_.empty() ? u"the system opens no window." : failure_;
    }
    // Before the dialog goes: the system makes another window active then, one that is enabled.
    others_.Enable();
    if (window_ != nullptr) {
        DestroyWindow(window_);
    }
    // The host may have been in another of its windows than the main one.
    if (active != nullptr && IsWindow(active) != FALSE && GetActiveWindow() != active) {
        SetActiveWindow(active);
    }
    return opened_;
}

/// The dialog's own loop, for the help key: not every control passes it on.
void TWin32FormView::RunMessages() {
    MSG message{};
    while (!closed_ && window_ != nullptr) {
        const BOOL got = GetMessageW(&message, nullptr, 0, 0);
        if (got == FALSE) {
            PostQuitMessage(static_cast<int>(message.wParam));  // meant for the host's loop
        }
        if (got == FALSE || got == -1) {
            return;
        }
        const bool is_own = message.hwnd == window_ || IsChild(window_, message.hwnd) != FALSE;
        if (is_own && message.message == WM_KEYDOWN && message.wParam == VK_F1) {
            SendHelp();
        } else if (IsDialogMessageW(window_, &message) == FALSE) {
            TranslateMessage(&message);
            DispatchMessageW(&message);
        }
    }
}

/// Makes all that the dialog shows, before it does.
void TWin32FormView::Open() {
    const TThemedScope themed;
    SetWindowTextW(window_, WideText(form_.Design().caption));
    font_.Reset(NewFormFont(scale_));
    line_height_ = LineHeight(font_.Get());
    SizeWindow();
    BuildControls();
    PlaceControls();
    form_.AttachView(this);
    for (std::size_t control = 0; control < windows_.size(); ++control) {
        ControlChanged(static_cast<std::int32_t>(control), kAllFormChanges);
    }
    opened_ = true;
    FocusFirst();
}

void TWin32FormView::SizeWindow() {
    const TActionFormDesign& design = form_.Design();
    const SIZE frame = FrameSize(window_);
    const SIZE size{ScaleLength(design.client_width, scale_) + frame.cx,
                    ScaleLength(design.client_height, scale_) + frame.cy};
    const HWND over = main_window_ != nullptr ? main_window_ : GetWindow(window_, GW_OWNER);
    const POINT place = CentredPlace(over, size);
    SetWindowPos(window_, nullptr, place.x, place.y, size.cx, size.cy,
                 SWP_NOZORDER | SWP_NOACTIVATE);
}

/// The design's smallest size, with the frame as it is on this system.
SIZE TWin32FormView::SmallestWindow() const {
    const TActionFormDesign& design = form_.Design();
    const SIZE frame = FrameSize(window_);
    const auto smallest = [this](std::int32_t whole, std::int32_t design_frame, LONG own_frame) {
        return whole == 0 ? 0 : ScaleLength(whole - design_frame, scale_) + own_frame;
    };
    return {smallest(design.min_window_width, kDesignFrameWidth, frame.cx),
            smallest(design.min_window_height, kDesignFrameHeight, frame.cy)};
}

void TWin32FormView::BuildControls() {
    // The order of making is the order of the focus.
    for (const std::int32_t control : TabOrder(form_.Design())) {
        BuildControl(control);
    }
}

void TWin32FormView::BuildControl(std::int32_t control) {
    TControlWindows& windows = Windows(control);
    windows = NewControlWindows(window_, Control(control), control);
    const auto font = reinterpret_cast<WPARAM>(font_.Get());
    SendMessageW(windows.main, WM_SETFONT, font, FALSE);
    for (const HWND item : windows.items) {
        SendMessageW(item, WM_SETFONT, font, FALSE);
    }
    if (!Control(control).hint.empty()) {
        AddHint(control);
    }
}

/// The tool tip goes with the dialog, which owns it.
void TWin32FormView::AddHint(std::int32_t control) {
    const HWND tip =
        CreateWindowExW(WS_EX_TOPMOST, TOOLTIPS_CLASSW, nullptr, WS_POPUP | TTS_ALWAYSTIP, 0, 0, 0,
                        0, window_, nullptr, OwnModule(), nullptr);
    TTTOOLINFOW tool{};
    tool.cbSize = TTTOOLINFOW_V1_SIZE;  // older common controls take no longer record
    tool.uFlags = TTF_IDISHWND | TTF_SUBCLASS;
    tool.hwnd = window_;
    tool.uId = reinterpret_cast<UINT_PTR>(Windows(control).main);
    tool.lpszText = const_cast<wchar_t*>(WideText(Control(control).hint));
    SendMessageW(tip, TTM_ADDTOOLW, 0, reinterpret_cast<LPARAM>(&tool));
}

void TWin32FormView::FocusFirst() {
    // As the tab key does it: the text of an edit becomes selected.
    const HWND first = GetNextDlgTabItem(window_, nullptr, FALSE);
    SendMessageW(window_, WM_NEXTDLGCTL, reinterpret_cast<WPARAM>(first), TRUE);
}

void TWin32FormView::PlaceControls() {
    RECT client{};
    GetClientRect(window_, &client);
    const TActionFormDesign& design = form_.Design();
    for (std::size_t control = 0; control < windows_.size(); ++control) {
        PlaceControl(static_cast<std::int32_t>(control),
                     zm::PlaceControl(design, design.controls[control], scale_, client.right,
                                      client.bottom));
    }
    InvalidateRect(window_, nullptr, TRUE);
}

void TWin32FormView::PlaceControl(std::int32_t control, const TRect& place) {
    const TControlWindows& windows = Windows(control);
    const auto move = [](HWND window, std::int32_t left, std::int32_t top, std::int32_t width,
                         std::int32_t height) {
        SetWindowPos(window, nullptr, left, top, width, height, SWP_NOZORDER | SWP_NOACTIVATE);
    };
    const std::int32_t width = place.right - place.left;
    const std::int32_t height = place.bottom - place.top;
    const TFormControlKind kind = Control(control).kind;
    // An edit's text stands at its top: its height is that of its text, in the middle of its row.
    const std::int32_t field_height = std::min(line_height_ + 2 * kFieldPadding, height);
    const std::int32_t field_top = place.top + (height - field_height) / 2;
    if (kind == fcComboBox || kind == fcColorBox) {
        SendMessageW(windows.main, CB_SETITEMHEIGHT, static_cast<WPARAM>(-1),
                     field_height - 2 * kListFrame);
        SendMessageW(windows.main, CB_SETITEMHEIGHT, 0, line_height_ + 2);
        // The height of a list's window includes what drops down.
        move(windows.main, place.left, field_top, width,
             field_height + (line_height_ + 2) * kListedItems);
    } else if (kind == fcEdit) {
        move(windows.main, place.left, field_top, width, field_height);
    } else {
        move(windows.main, place.left, place.top, width, height);
    }
    const std::vector<TRect> items = RadioItemPlaces(Control(control), scale_);
    for (std::size_t item = 0; item < windows.items.size(); ++item) {
        const TRect& within = items[item];
        move(windows.items[item], place.left + within.left, place.top + within.top,
             within.right - within.left, within.bottom - within.top);
    }
}

void TWin32FormView::ControlChanged(std::int32_t control, std::uint8_t changes) {
    const TSyncGuard guard(syncing_);
    const TControlWindows& windows = Windows(control);
    if ((changes & fchText) != 0) {
        ShowText(control);
    }
    if ((changes & (fchIndex | fchColor)) != 0) {
        ShowIndex(control);
    }
    if ((changes & fchChecked) != 0 && Control(control).kind == fcCheckBox) {
        SendMessageW(windows.main, BM_SETCHECK,
                     form_.State(control).checked ? BST_CHECKED : BST_UNCHECKED, 0);
    }
    if ((changes & fchEnabled) != 0) {
        ShowEnabled(control);
    }
    if ((changes & fchFont) != 0 && Control(control).kind == fcSamplePanel) {
        InvalidateRect(windows.main, nullptr, TRUE);
    }
}

void TWin32FormView::ShowText(std::int32_t control) {
    const HWND window = Windows(control).main;
    const std::u16string& text = form_.State(control).text;
    switch (Control(control).kind) {
        case fcSamplePanel: InvalidateRect(window, nullptr, TRUE); break;
        case fcComboBox:
        case fcColorBox:
        case fcRadioGroup: break;
        default:
            // A text that the user has just typed must not lose its caret.
            if (WindowText(window) != text) {
                SetWindowTextW(window, WideText(text));
            }
            break;
    }
}

void TWin32FormView::ShowIndex(std::int32_t control) {
    const TControlWindows& windows = Windows(control);
    const std::int32_t index = form_.State(control).index;
    switch (Control(control).kind) {
        case fcComboBox:
        case fcColorBox:
            SendMessageW(windows.main, CB_SETCURSEL, static_cast<WPARAM>(index), 0);
            InvalidateRect(windows.main, nullptr, TRUE);
            break;
        case fcRadioGroup:
            // The tab key goes to the chosen button only; arrow keys go on from there.
            for (std::size_t item = 0; item < windows.items.size(); ++item) {
                const bool chosen = static_cast<std::size_t>(index) == item;
                const LONG style = GetWindowLongW(windows.items[item], GWL_STYLE) & ~WS_TABSTOP;
                SendMessageW(windows.items[item], BM_SETCHECK, chosen ? BST_CHECKED : BST_UNCHECKED,
                             0);
                SetWindowLongW(windows.items[item], GWL_STYLE, chosen ? style | WS_TABSTOP : style);
            }
            break;
        default: break;
    }
}

void TWin32FormView::ShowEnabled(std::int32_t control) {
    const TControlWindows& windows = Windows(control);
    const BOOL enabled = form_.State(control).enabled ? TRUE : FALSE;
    if (enabled == FALSE && GetFocus() == windows.main) {
        // The keyboard would be lost on a window that takes no input.
        SendMessageW(window_, WM_NEXTDLGCTL, 0, FALSE);
    }
    EnableWindow(windows.main, enabled);
    for (const HWND item : windows.items) {
        EnableWindow(item, enabled);
    }
    InvalidateRect(windows.main, nullptr, TRUE);
}

void TWin32FormView::CloseWindow() {
    closed_ = true;
    WakeLoop();
}

/// The loop may wait inside of the call that brought it here.
void TWin32FormView::WakeLoop() {
    PostThreadMessageW(GetCurrentThreadId(), WM_NULL, 0, 0);
}

bool TWin32FormView::PickFile(TFilePick pick, const std::vector<TFileFilter>& filters,
                              const std::u16string& initial_folder, std::u16string& file_name) {
    const TThemedScope themed;
    return RunFilePicker(window_, pick, filters, initial_folder, file_name);
}

bool TWin32FormView::PickFont(TFormFont& font) {
    const TThemedScope themed;
    return RunFontPicker(window_, font);
}

bool TWin32FormView::PickColor(TColor& color) {
    const TThemedScope themed;
    return RunColorPicker(window_, color);
}

void TWin32FormView::Beep(std::uint32_t sound) {
    MessageBeep(sound);
}

void TWin32FormView::ShowError(const std::u16string& message) {
    const TThemedScope themed;
    MessageBoxW(window_, WideText(message), WideText(form_.Design().caption), MB_OK | MB_ICONERROR);
}

}  // namespace zm
