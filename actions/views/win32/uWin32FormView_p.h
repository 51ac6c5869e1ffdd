#pragma once

#include <windows.h>

#include <cstdint>
#include <string>
#include <vector>

#include "actions/uActionForms.h"
#include "actions/views/win32/uWin32SpeedButton_p.h"
#include "actions/views/win32/uWin32System_p.h"

namespace zm {

/// Windows of one control. A radio group's buttons are siblings of its frame, as the system's
/// dialog keys expect it.
struct TControlWindows {
    HWND main = nullptr;
    std::vector<HWND> items;
};

/// The thread's other windows, which take no input while a form is open.
class TOtherWindows {
public:
    TOtherWindows() = default;
    ~TOtherWindows() { Enable(); }
    TOtherWindows(const TOtherWindows&) = delete;
    TOtherWindows& operator=(const TOtherWindows&) = delete;
    void Disable(HWND dialog, HWND main_window);
    void Enable();

private:
    static BOOL CALLBACK DisableOne(HWND window, LPARAM others);

    HWND dialog_ = nullptr;
    std::vector<HWND> disabled_;
};

/// The window of one form: a dialog of the system with the controls of the design.
class TWin32FormView : public IActionFormView {
public:
    TWin32FormView(IActionForm& form, const TFormShowOptions& options);
    ~TWin32FormView() override;
    TWin32FormView(const TWin32FormView&) = delete;
    TWin32FormView& operator=(const TWin32FormView&) = delete;

    /// Shows the window and returns when it has closed. False with a sentence in `reason` when
    /// it could not be made.
    bool Run(std::u16string& reason);

    void ControlChanged(std::int32_t control, std::uint8_t changes) override;
    void CloseWindow() override;
    bool PickFile(TFilePick pick, const std::vector<TFileFilter>& filters,
                  const std::u16string& initial_folder, std::u16string& file_name) override;
    bool PickFont(TFormFont& font) override;
    bool PickColor(TColor& color) override;
    void Beep(std::uint32_t sound) override;
    void ShowError(const std::u16string& message) override;

private:
    const TFormControl& Control(std::int32_t control) const;
    TControlWindows& Windows(std::int32_t control);
    /// The control that a window stands for, -1 for none.
    std::int32_t ControlOf(HWND window) const;

    void RunMessages();
    static void WakeLoop();

    // Making the window.
    void Open();
    void SizeWindow();
    void BuildControls();
    void BuildControl(std::int32_t control);
    void AddHint(std::int32_t control);
    void FocusFirst();
    void PlaceControls();
    void PlaceControl(std::int32_t control, const TRect& place);
    SIZE SmallestWindow() const;

    // Showing states.
    void ShowText(std::int32_t control);
    void ShowIndex(std::int32_t control);
    void ShowEnabled(std::int32_t control);

    // The user's acts.
    void OnCommand(HWND window, int id, int code);
    void OnEditChanged(std::int32_t control);
    void OnListEvent(std::int32_t control, int code);
    void OnColorChosen(std::int32_t control);
    void OnButtonClicked(std::int32_t control, HWND window);
    void InsertVariable();
    void SendHelp();
    INT_PTR OnControlColor(HDC device, HWND window);
    void OnDrawItem(const DRAWITEMSTRUCT& draw);
    INT_PTR HandleMessage(UINT message, WPARAM wparam, LPARAM lparam);
    static INT_PTR CALLBACK DialogProc(HWND window, UINT message, WPARAM wparam, LPARAM lparam);

    IActionForm& form_;
    std::int32_t scale_;
    HWND main_window_;
    HWND window_ = nullptr;
    TGdiObject<HFONT> font_;
    std::int32_t line_height_ = 0;
    std::vector<TControlWindows> windows_;
    TSpeedButtonClass speed_button_class_;
    TOtherWindows others_;
    /// Above 0 while the view itself changes windows: what they tell is then no user's act.
    int syncing_ = 0;
    bool opened_ = false;
    bool closed_ = false;
    std::u16string failure_;
    /// Colour box whose choice waits for its list to close.
    std::int32_t pending_color_box_ = -1;
    bool color_confirmed_ = false;
};

/// Windows of a control, without places. Raises when the system refuses.
TControlWindows NewControlWindows(HWND dialog, const TFormControl& control, std::int32_t index);
/// The design's font at a scale in percent: the face that the user has chosen for dialogs, in a
/// size that fits the design.
HFONT NewFormFont(std::int32_t scale_percent);
std::int32_t LineHeight(HFONT font);
std::u16string WindowText(HWND window);
/// Draws an item of a colour box, swatch and name.
void DrawColorItem(const DRAWITEMSTRUCT& draw, const TFormControl& control,
                   const TFormControlState& state);
/// Draws the text of a panel in the panel's font, centred and cut at the panel's edges.
void DrawSample(const DRAWITEMSTRUCT& draw, const TFormControlState& state);
/// Font record of the system for a stored font, at the resolution of a device.
LOGFONTW FontRecord(const TFormFont& font, HDC device);

// The pickers, modal to `parent`.
bool RunFilePicker(HWND parent, TFilePick pick, const std::vector<TFileFilter>& filters,
                   const std::u16string& initial_folder, std::u16string& file_name);
bool RunFontPicker(HWND parent, TFormFont& font);
bool RunColorPicker(HWND parent, TColor& color);

}  // namespace zm
