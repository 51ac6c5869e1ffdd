#include <windows.h>

#include <commdlg.h>

#include <algorithm>
#include <array>

#include "actions/uActionFormLayout.h"
#include "actions/views/win32/uWin32FormView_p.h"

/// File, font and colour dialogs of the system.
namespace zm {
namespace {

constexpr wchar_t kDialogLibrary[] = L"comdlg32.dll";
constexpr std::size_t kMaxFileNameLength = 32768;  // of the system's longest names, with the zero
constexpr INT kPointTenths = 10;

/// "Image files", zero, "*.bmp;*.png", zero, and so on to an empty text.
std::u16string FilterTexts(const std::vector<TFileFilter>& filters) {
    std::u16string texts;
    for (const TFileFilter& filter : filters) {
        std::u16string patterns;
        for (const std::u16string& extension : filter.extensions) {
            patterns += (patterns.empty() ? u"*." : u";*.") + extension;
        }
        texts += filter.name + u'\0' + (patterns.empty() ? u"*.*" : patterns) + u'\0';
    }
    return texts + u'\0';
}

bool IsFolder(const std::u16string& name) {
    const DWORD attributes =
        name.empty() ? INVALID_FILE_ATTRIBUTES : GetFileAttributesW(WideText(name));
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
}

/// What the dialog gave back, for what it was shown. A part that the user left alone stays as it
/// was stored, even where the dialog could not show it.
TFormFont ChosenFont(const TFormFont& before, const CHOOSEFONTW& choice) {
    const LOGFONTW& record = *choice.lpLogFont;
    const TFormFont shown = FontToShow(before);
    TFormFont font = before;
    const std::u16string name = ModelText(record.lfFaceName);
    if (!name.empty() && name != shown.name) {
        font.name = name;
    }
    const std::int32_t size = (choice.iPointSize + kPointTenths / 2) / kPointTenths;
    if (size > 0 && size != shown.size) {
        font.size = size;
    }
    if (choice.rgbColors != ScreenColor(before.color)) {
        font.color = static_cast<TColor>(choice.rgbColors);
    }
    font.styles = static_cast<std::uint8_t>(
        (record.lfWeight >= FW_SEMIBOLD ? ffBold : 0) | (record.lfItalic != 0 ? ffItalic : 0) |
        (record.lfUnderline != 0 ? ffUnderline : 0) | (record.lfStrikeOut != 0 ? ffStrikeOut : 0));
    return font;
}

}  // namespace

bool RunFilePicker(HWND parent, TFilePick pick, const std::vector<TFileFilter>& filters,
                   const std::u16string& initial_folder, std::u16string& file_name) {
    const std::u16string filter_texts = FilterTexts(filters);
    std::vector<wchar_t> name(kMaxFileNameLength, L'\0');
    OPENFILENAMEW dialog{};
    dialog.lStructSize = sizeof(dialog);
    dialog.hwndOwner = parent;
    dialog.lpstrFilter = WideText(filter_texts);
    dialog.nFilterIndex = 1;
    dialog.lpstrFile = name.data();
    dialog.nMaxFile = static_cast<DWORD>(name.size());
    dialog.lpstrInitialDir = IsFolder(initial_folder) ? WideText(initial_folder) : nullptr;
    dialog.lpstrTitle = pick == fpOpen ? L"Open Image File" : L"Save Image File";
    // The current folder is the host's. Nothing is written to the picked file now, so that there
    // is nothing to ask about one that exists.
    dialog.Flags = OFN_EXPLORER | OFN_ENABLESIZING | OFN_HIDEREADONLY | OFN_NOCHANGEDIR |
                   (pick == fpOpen ? OFN_FILEMUSTEXIST : OFN_NOTESTFILECREATE);
    const bool picked = pick == fpOpen ? SystemFunction<decltype(&GetOpenFileNameW)>(
                                             kDialogLibrary, "GetOpenFileNameW")(&dialog) != FALSE
                                       : SystemFunction<decltype(&GetSaveFileNameW)>(
                                             kDialogLibrary, "GetSaveFileNameW")(&dialog) != FALSE;
    if (picked) {
        file_name = ModelText(name.data());
    }
    return picked;
}

bool RunFontPicker(HWND parent, TFormFont& font) {
    const HDC screen = GetDC(nullptr);
    LOGFONTW record = FontRecord(font, screen);
    ReleaseDC(nullptr, screen);
    CHOOSEFONTW choice{};
    choice.lStructSize = sizeof(choice);
    choice.hwndOwner = parent;
    choice.lpLogFont = &record;
    choice.rgbColors = ScreenColor(font.color);
    // A script is not stored, so none is offered.
    choice.Flags = CF_SCREENFONTS | CF_EFFECTS | CF_INITTOLOGFONTSTRUCT | CF_NOSCRIPTSEL;
    if (SystemFunction<decltype(&ChooseFontW)>(kDialogLibrary, "ChooseFontW")(&choice) == FALSE) {
        return false;
    }
    font = ChosenFont(font, choice);
    return true;
}

bool RunColorPicker(HWND parent, TColor& color) {
    // The user's own colours last as long as the process.
    static std::array<COLORREF, 16> own_colors = [] {
        std::array<COLORREF, 16> colors{};
        colors.fill(RGB(255, 255, 255));
        return colors;
    }();
    CHOOSECOLORW choice{};
    choice.lStructSize = sizeof(choice);
    choice.hwndOwner = parent;
    choice.rgbResult = ScreenColor(color);
    choice.lpCustColors = own_colors.data();
    choice.Flags = CC_RGBINIT | CC_FULLOPEN;
    if (SystemFunction<decltype(&ChooseColorW)>(kDialogLibrary, "ChooseColorW")(&choice) == FALSE) {
        return false;
    }
    // A system colour stays one unless another was chosen.
    if (choice.rgbResult != ScreenColor(color)) {
        color = static_cast<TColor>(choice.rgbResult);
    }
    return true;
}

}  // namespace zm
