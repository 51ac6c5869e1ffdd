#pragma once

#include <windows.h>

#include <initializer_list>
#include <string>
#include <vector>

#include "actions/views/win32/uWin32FormView_p.h"

/// What the job editor's windows have in common. They look as the steps' dialogs do: the same
/// font, the same theme. The system enlarges them together with those where its user wants that.
namespace zm::qvrun {

// Pixels of a plain screen.
inline constexpr int kMargin = 12;
inline constexpr int kGap = 6;
inline constexpr wchar_t kMessageTitle[] = L"Job Editor";

/// A list of rows with one text per column. The last column takes the room that is left.
class TRowList {
public:
    using TRow = std::vector<std::u16string>;

    void Attach(HWND list, std::initializer_list<const char16_t*> titles);
    HWND Window() const { return list_; }
    /// Replaces all rows; none is chosen then.
    void SetRows(const std::vector<TRow>& rows);
    int Count() const;
    /// -1 for none.
    int Chosen() const;
    /// An index that is none chooses nothing.
    void Choose(int index) const;
    void FitColumns() const;

private:
    HWND list_ = nullptr;
    int columns_ = 0;
};

/// A modal dialog of the system with a size that its user may change.
class TListDialog {
public:
    TListDialog() = default;
    virtual ~TListDialog() = default;
    TListDialog(const TListDialog&) = delete;
    TListDialog& operator=(const TListDialog&) = delete;

    /// Shows the window, centred over its owner or on the screen, until it is closed. Raises
    /// when it cannot be made.
    void Run(HWND owner);

protected:
    /// Makes the controls, in the order of the focus, and tells the first size of the client.
    virtual SIZE Build() = 0;
    virtual SIZE SmallestClient() const = 0;
    virtual void PlaceControls(int width, int height) = 0;
    /// A button or menu entry was used.
    virtual void OnCommand(int id) = 0;
    virtual void OnNotify(const NMHDR& notice) = 0;
    /// Background of a label; nil for the dialog's own.
    virtual HBRUSH LabelBackground(HWND, HDC) { return nullptr; }

    HWND Window() const { return window_; }
    void Close();
    /// Raises when the system refuses.
    HWND AddControl(const wchar_t* window_class, DWORD style, const std::u16string& text, int id);
    HWND AddButton(const std::u16string& caption, int id);
    HWND AddList(int id);
    SIZE TextSize(const std::u16string& text, int width = 0) const;
    /// Size that holds each of the buttons.
    SIZE ButtonSize(std::initializer_list<HWND> buttons) const;
    /// Gives the keyboard to a control, as its dialog keys do.
    void Focus(HWND control) const;
    void Enable(HWND control, bool enabled, HWND next_focus) const;

private:
    void Open();
    void Centre(SIZE client);
    SIZE WholeSize(SIZE client) const;
    INT_PTR HandleMessage(UINT message, WPARAM wparam, LPARAM lparam);
    static INT_PTR CALLBACK DialogProc(HWND window, UINT message, WPARAM wparam, LPARAM lparam);

    HWND window_ = nullptr;
    TGdiObject<HFONT> font_;
    bool opened_ = false;
    std::string failure_;
};

inline void Place(HWND window, int left, int top, int width, int height) {
    SetWindowPos(window, nullptr, left, top, width, height, SWP_NOZORDER | SWP_NOACTIVATE);
}

/// A message with a button to close it.
void Tell(HWND owner, UINT icon, const std::u16string& text);

}  // namespace zm::qvrun
