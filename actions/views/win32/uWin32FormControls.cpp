#include <windows.h>

#include <commctrl.h>

#include <algorithm>
#include <array>

#include "actions/uActionFormLayout.h"
#include "actions/uColorNames.h"
#include "actions/views/uFormViewParts_p.h"
#include "actions/views/win32/uWin32FormIds.h"
#include "actions/views/win32/uWin32FormView_p.h"

/// Making the windows of the controls, and what they draw themselves.
namespace zm {
namespace {

/// Of the form's font, in pixels at 100 percent: rows and widths of the design are made for it.
constexpr std::int32_t kFontHeight = 12;
constexpr std::int32_t kPointsPerInch = 72;
constexpr LONG kSwatchGap = 2;

/// What makes a window of the system a control of a kind.
struct TWindowLook {
    const wchar_t* window_class;
    DWORD style;
    DWORD extended_style = 0;
};

/// The default button is the one that the enter key presses from every field.
TWindowLook ButtonLook(const TFormControl& control) {
    if (control.kind == fcSpeedButton) {
        return {kSpeedButtonClass, WS_GROUP};
    }
    const DWORD style = WS_TABSTOP | WS_GROUP;
    return {WC_BUTTONW, style | (control.button == fbOk ? BS_DEFPUSHBUTTON : BS_PUSHBUTTON)};
}

// Every control begins a group, so that arrow keys stay inside a radio group.
TWindowLook LookOf(const TFormControl& control) {
    constexpr DWORD kListStyle = WS_TABSTOP | WS_GROUP | WS_VSCROLL | CBS_DROPDOWNLIST;
    switch (control.kind) {
        case fcLabel: return {WC_STATICW, WS_GROUP | SS_LEFTNOWORDWRAP};
        case fcWrappedLabel: return {WC_STATICW, WS_GROUP | SS_LEFT};
        case fcEdit: return {WC_EDITW, WS_TABSTOP | WS_GROUP | ES_AUTOHSCROLL, WS_EX_CLIENTEDGE};
        case fcComboBox: return {WC_COMBOBOXW, kListStyle};
        case fcColorBox: return {WC_COMBOBOXW, kListStyle | CBS_OWNERDRAWFIXED | CBS_HASSTRINGS};
        case fcRadioGroup: return {WC_BUTTONW, WS_GROUP | BS_GROUPBOX};
        case fcCheckBox: return {WC_BUTTONW, WS_TABSTOP | WS_GROUP | BS_AUTOCHECKBOX};
        case fcSamplePanel: return {WC_STATICW, WS_GROUP | SS_OWNERDRAW, WS_EX_STATICEDGE};
        case fcButton:
        case fcSpeedButton: break;
    }
    return ButtonLook(control);
}

/// A visible child without size; PlaceControls gives it its place.
HWND NewWindow(HWND dialog, const TWindowLook& look, const std::u16string& text, int id) {
    const HWND window =
        CreateWindowExW(look.extended_style, look.window_class, WideText(text),
                        WS_CHILD | WS_VISIBLE | look.style, 0, 0, 0, 0, dialog,
                        reinterpret_cast<HMENU>(static_cast<INT_PTR>(id)), OwnModule(), nullptr);
    if (window == nullptr) {
        throw std::runtime_error("The system is out of windows");
    }
    return window;
}

/// A frame's title is no mnemonic: its marks are doubled for the system.
std::u16string PlainTitle(const std::u16string& title) {
    std::u16string doubled;
    for (const char16_t letter : title) {
        doubled.append(letter == u'&' ? 2 : 1, letter);
    }
    return doubled;
}

/// The buttons follow their frame: the system takes what stands behind a group's first window, up
/// to the next group, for one choice.
void AddRadioButtons(HWND dialog, const TFormControl& group, std::int32_t index,
                     TControlWindows& windows) {
    for (std::size_t item = 0; item < group.items.size(); ++item) {
        const DWORD begins_group = item == 0 ? WS_GROUP : 0;
        const TWindowLook look{WC_BUTTONW, begins_group | BS_AUTORADIOBUTTON};
        windows.items.push_back(NewWindow(dialog, look, group.items[item],
                                          RadioItemId(index, static_cast<std::int32_t>(item))));
    }
}

}  // namespace

TControlWindows NewControlWindows(HWND dialog, const TFormControl& control, std::int32_t index) {
    const std::u16string text =
        control.kind == fcRadioGroup ? PlainTitle(control.caption) : control.caption;
    TControlWindows windows{
        NewWindow(dialog, LookOf(control), text, ControlWindowId(control, index)), {}};
    if (control.kind == fcRadioGroup) {
        AddRadioButtons(dialog, control, index, windows);
    } else if (control.kind == fcEdit) {
        SendMessageW(windows.main, EM_SETLIMITTEXT, 0, 0);  // as much as memory holds
    } else {
        for (const std::u16string& item : control.items) {
            SendMessageW(windows.main, CB_ADDSTRING, 0, reinterpret_cast<LPARAM>(WideText(item)));
        }
    }
    return windows;
}

HFONT NewFormFont(std::int32_t scale_percent) {
    NONCLIENTMETRICSW metrics{};
    metrics.cbSize = sizeof(metrics);
    SystemParametersInfoW(SPI_GETNONCLIENTMETRICS, sizeof(metrics), &metrics, 0);
    // The face is the user's; the size is the design's, because the host's scale already says how
    // large the user wants all.
    LOGFONTW font = metrics.lfMessageFont;
    font.lfHeight = -ScaleLength(kFontHeight, scale_percent);
    font.lfWidth = 0;
    return CreateFontIndirectW(&font);
}

std::int32_t LineHeight(HFONT font) {
    const HDC screen = GetDC(nullptr);
    const HGDIOBJ old_font = SelectObject(screen, font);
    TEXTMETRICW metrics{};
    GetTextMetricsW(screen, &metrics);
    SelectObject(screen, old_font);
    ReleaseDC(nullptr, screen);
    return metrics.tmHeight;
}

std::u16string WindowText(HWND window) {
    // Lengths come from the system and are those of texts in memory: they cannot overflow here.
    const int length = GetWindowTextLengthW(window);
    std::u16string text(static_cast<std::size_t>(length) + 1, u'\0');
    const int read = GetWindowTextW(window, reinterpret_cast<wchar_t*>(text.data()), length + 1);
    text.resize(static_cast<std::size_t>(read));
    return text;
}

void DrawColorItem(const DRAWITEMSTRUCT& draw, const TFormControl& control,
                   const TFormControlState& state) {
    const bool selected = (draw.itemState & ODS_SELECTED) != 0;
    const bool disabled = (draw.itemState & ODS_DISABLED) != 0;
    FillRect(draw.hDC, &draw.rcItem, GetSysColorBrush(selected ? COLOR_HIGHLIGHT : COLOR_WINDOW));
    if (draw.itemID >= control.items.size()) {
        return;
    }
    const auto index = static_cast<std::int32_t>(draw.itemID);
    RECT swatch = draw.rcItem;
    InflateRect(&swatch, -kSwatchGap, -kSwatchGap);
    swatch.right = swatch.left + (swatch.bottom - swatch.top) * 3 / 2;
    // The entry for other colours shows the one that is set.
    const bool has_color = index != 0 || state.index == 0;
    if (has_color) {
        const TGdiObject<HBRUSH> brush(
            CreateSolidBrush(ScreenColor(index == 0 ? state.color : ColorBoxColor(index))));
        FillRect(draw.hDC, &swatch, brush.Get());
        FrameRect(draw.hDC, &swatch, GetSysColorBrush(COLOR_WINDOWFRAME));
    }
    RECT place = draw.rcItem;
    place.left = swatch.right + 3 * kSwatchGap;
    const int text_color = selected ? COLOR_HIGHLIGHTTEXT : COLOR_WINDOWTEXT;
    SetBkMode(draw.hDC, TRANSPARENT);
    SetTextColor(draw.hDC, GetSysColor(disabled ? COLOR_GRAYTEXT : text_color));
    DrawTextW(draw.hDC, WideText(control.items[draw.itemID]), -1, &place,
              DT_SINGLELINE | DT_VCENTER | DT_NOPREFIX);
    if ((draw.itemState & ODS_FOCUS) != 0 && (draw.itemState & ODS_NOFOCUSRECT) == 0) {
        DrawFocusRect(draw.hDC, &draw.rcItem);
    }
}

LOGFONTW FontRecord(const TFormFont& font, HDC device) {
    const TFormFont shown = FontToShow(font);
    LOGFONTW record{};
    record.lfHeight = -MulDiv(shown.size, GetDeviceCaps(device, LOGPIXELSY), kPointsPerInch);
    record.lfWeight = (shown.styles & ffBold) != 0 ? FW_BOLD : FW_NORMAL;
    record.lfItalic = (shown.styles & ffItalic) != 0 ? 1 : 0;
    record.lfUnderline = (shown.styles & ffUnderline) != 0 ? 1 : 0;
    record.lfStrikeOut = (shown.styles & ffStrikeOut) != 0 ? 1 : 0;
    record.lfCharSet = DEFAULT_CHARSET;
    const std::size_t length = std::min<std::size_t>(shown.name.size(), LF_FACESIZE - 1);
    std::copy_n(WideText(shown.name), length, record.lfFaceName);
    return record;
}

void DrawSample(const DRAWITEMSTRUCT& draw, const TFormControlState& state) {
    RECT place = draw.rcItem;
    FillRect(draw.hDC, &place, GetSysColorBrush(COLOR_BTNFACE));
    const std::u16string start = state.text.substr(0, kMaxSampleLength);
    // The size on screen is the stored one at any scale of the form: it shows what will be drawn.
    const LOGFONTW record = FontRecord(state.font, draw.hDC);
    const TGdiObject<HFONT> font(CreateFontIndirectW(&record));
    const HGDIOBJ old_font = SelectObject(draw.hDC, font.Get());
    SetBkMode(draw.hDC, TRANSPARENT);
    SetTextColor(draw.hDC, ScreenColor(state.font.color));
    DrawTextW(draw.hDC, WideText(start), static_cast<int>(start.size()), &place,
              DT_SINGLELINE | DT_CENTER | DT_VCENTER | DT_NOPREFIX);
    SelectObject(draw.hDC, old_font);
}

}  // namespace zm
