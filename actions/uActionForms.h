#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// The configuration forms as their views see them, free of any toolkit.
///
/// A form is declared once (TActionFormDesign); a live form (IActionForm) holds the state of its
/// controls and knows all rules; a view (IActionFormView) shows the controls with a toolkit,
/// passes on what the user does, and offers the toolkit's pickers. A toolkit is reached through
/// IActionFormToolkit, which is asked for when a form is opened and not before.
///
/// A view may live in a module of its own: it needs this header and uActionFormLayout only, and
/// calls the form through its virtual functions. Everything happens on the thread that opened the
/// form, the host's user-interface thread.
namespace zm {

class TActionForm;

/// What a control is. Only the kinds from fcEdit to fcColorBox and buttons take the focus.
enum TFormControlKind : std::uint8_t {
    fcLabel,         ///< one line; its mnemonic leads to `focus_control`
    fcWrappedLabel,  ///< breaks into lines within its bounds
    fcEdit,          ///< one line of text without a limit of length
    fcComboBox,      ///< drop-down list, no typing
    fcRadioGroup,    ///< frame with a title and one radio button per item
    fcCheckBox,
    fcColorBox,     ///< drop-down list of colours, each with a swatch; item 0 is "Custom..."
    fcSamplePanel,  ///< sunken frame that shows its text, centred, in the font of its state
    fcButton,
    fcSpeedButton,  ///< flat button that never takes the focus
};

/// What a button does; see IActionForm::PressButton.
enum TFormButton : std::uint8_t {
    fbNone,
    fbOk,        ///< the form's default button
    fbCancel,    ///< the form's cancel button
    fbOpenFile,  ///< picks an existing file into the edit `target`
    fbSaveFile,  ///< picks a file to write into the edit `target`
    fbFont,      ///< picks the font of the panel `target`
    fbVariable,  ///< inserts a variable; pressed by IActionForm::PressInsertVariable
};

/// Sides that keep their distance to the form's when it is resized; a bit set. Left and top is
/// the usual case; both of a pair stretch the control.
enum TFormAnchors : std::uint8_t { faLeft = 1, faTop = 2, faRight = 4, faBottom = 8 };

/// One control as declared.
///
/// Captions of labels, buttons, check boxes and items of radio groups carry mnemonics: "&" stands
/// before the letter, "&&" is the character itself. Titles, items of lists and texts are plain.
struct TFormControl {
    TFormControlKind kind = fcLabel;
    std::u16string name;
    std::u16string caption;
    /// Key of the step's text; empty when nothing is stored. A sample panel stores four:
    /// the key with "_name", "_size", "_color" and "_styles" behind it.
    std::u16string key;
    /// Within the client area, in pixels at 96 dpi; right and bottom are exclusive.
    TRect bounds;
    std::uint8_t anchors = faLeft | faTop;
    /// Load defaults: text of an edit; index of a list or radio group, 0 or 1 for a check box,
    /// value of a colour box. (A panel's are those of TFormFont.)
    std::u16string default_text;
    std::int32_t default_value = 0;
    std::vector<std::u16string> items;  ///< of lists, radio groups and colour boxes
    std::int32_t columns = 1;           ///< of a radio group
    bool takes_variable = false;        ///< an edit that the "{V}" button serves
    TFormButton button = fbNone;
    std::u16string target;         ///< control that a button fills
    std::u16string focus_control;  ///< control that a label names
    std::u16string hint;           ///< shown while the pointer rests on the control
};

enum TFormBorder : std::uint8_t { fbsDialog, fbsSizeable };

/// A form as declared. Controls stand in the order in which their keys are stored; TabOrder
/// (uActionFormLayout.h) gives the order of the focus.
struct TActionFormDesign {
    std::u16string class_name;
    std::u16string caption;
    std::int32_t client_width = 0;  ///< pixels at 96 dpi
    std::int32_t client_height = 0;
    TFormBorder border = fbsDialog;
    /// Smallest size of the whole window, frame and title included; 0 for none.
    std::int32_t min_window_width = 0;
    std::int32_t min_window_height = 0;
    std::int32_t help_context = 0;  ///< page that the help key shows
    std::vector<TFormControl> controls;

    // The rules; nil where a form has none. Views leave them alone.
    /// Brings enabling, label texts and samples in line; after loading and after every change.
    void (*apply_rules)(TActionForm& form) = nullptr;
    /// Carries the user's change of an edit over to others.
    void (*link)(TActionForm& form, std::int32_t changed_control) = nullptr;
    /// Whether OK may close the form.
    bool (*check)(const TActionForm& form) = nullptr;
};

/// Bits of `TFormFont::styles`.
enum TFormFontStyle : std::uint8_t {
    ffBold = 1,
    ffItalic = 2,
    ffUnderline = 4,
    ffStrikeOut = 8,
};

/// A font as stored. Texts of foreign origin can hold anything here; FontToShow
/// (uActionFormLayout.h) gives one that every toolkit can create.
struct TFormFont {
    std::u16string name = u"Tahoma";
    std::int32_t size = 16;  ///< points
    TColor color = 0;
    std::uint8_t styles = 0;
    friend bool operator==(const TFormFont&, const TFormFont&) = default;
};

/// System colours that a field has while it is enabled and while it is not.
inline constexpr TColor kColorWindow = static_cast<TColor>(0xFF000005);
inline constexpr TColor kColorBtnFace = static_cast<TColor>(0xFF00000F);

/// Present state of a control.
struct TFormControlState {
    /// Text of an edit or panel; caption, with mnemonics, of the kinds that have one.
    std::u16string text;
    /// Chosen item of a list, radio group or colour box; always one of the items.
    std::int32_t index = 0;
    bool checked = false;
    bool enabled = true;
    TColor background = kColorWindow;  ///< of edits and drop-down lists
    TColor color = 0;                  ///< of a colour box
    TFormFont font;                    ///< of a panel
};

/// What of a control's state has changed; a bit set.
enum TFormChange : std::uint8_t {
    fchText = 1,
    fchIndex = 2,
    fchChecked = 4,
    fchEnabled = 8,  ///< `enabled` and `background`
    fchColor = 16,
    fchFont = 32,
};

enum TFilePick : std::uint8_t { fpOpen, fpSave };

/// A choice of a file picker's list of file types.
struct TFileFilter {
    std::u16string name;
    /// Lower case, without dots, compared without case; empty for all files.
    std::vector<std::u16string> extensions;
};

/// The warning sound of a failed check, by its number in MessageBeep.
inline constexpr std::uint32_t kWarningBeep = 48;

/// What the form asks of the window that shows it. Calls come only while one of the form's
/// events runs, or while it is attached.
class IActionFormView {
public:
    virtual ~IActionFormView() = default;
    /// The state of a control is no longer what the view last saw; `changes` are TFormChange
    /// bits. What the view itself told comes back only when the form has altered it. A view that
    /// puts a text into its control and is told of that by its toolkit may pass it on again.
    virtual void ControlChanged(std::int32_t control, std::uint8_t changes) = 0;
    /// The form has its result: the window is to close.
    virtual void CloseWindow() = 0;
    /// Lets the user pick a file; False when none was picked. The first filter is chosen at
    /// first; a name comes back as it was typed, without an extension of the filter's. The
    /// folder ends in a separator; it may be empty or may not exist (it can hold an unexpanded
    /// variable), and counts for nothing then.
    virtual bool PickFile(TFilePick pick, const std::vector<TFileFilter>& filters,
                          const std::u16string& initial_folder, std::u16string& file_name) = 0;
    /// Lets the user change a font, colour included; False when it stays.
    virtual bool PickFont(TFormFont& font) = 0;
    /// Lets the user change a colour; False when it stays.
    virtual bool PickColor(TColor& color) = 0;
    virtual void Beep(std::uint32_t sound) = 0;
    /// Tells of an error inside an event, in a message box; the form stays open.
    virtual void ShowError(const std::u16string& message) = 0;
};

enum TFormResult : std::uint8_t { frNone, frOk, frCancel };

/// A live form: state and events. Controls are indexes into `Design().controls`.
///
/// Events come from the view as the user acts. They never raise: an error inside is shown by the
/// view and leaves the form open. Events on a disabled control, indexes that are none of a
/// control's items, and repetitions of the present state do nothing.
class IActionForm {
public:
    virtual ~IActionForm() = default;
    virtual const TActionFormDesign& Design() const = 0;
    /// Valid until the form ends; its contents follow the events.
    virtual const TFormControlState& State(std::int32_t control) const = 0;
    virtual TFormResult Result() const = 0;

    /// The view that is told of changes, or nil. It stays the caller's. Attach it before the
    /// first event and detach it before it goes.
    virtual void AttachView(IActionFormView* view) = 0;

    /// The whole text of an edit after the user's change. An edit holds one line: the text is cut
    /// at the first line break or zero character.
    virtual void SetText(std::int32_t control, const std::u16string& text) = 0;
    /// Choice in a list, radio group or colour box. Item 0 of a colour box asks the view for a
    /// colour, so call it when the user has made the choice and not while a list is open; when
    /// no colour is picked, the earlier choice is announced again.
    virtual void SetIndex(std::int32_t control, std::int32_t index) = 0;
    virtual void SetChecked(std::int32_t control, bool checked) = 0;
    /// Any button but "{V}". OK runs the form's check first: when it fails, the view beeps and
    /// nothing closes. Escape and the window's close box press the cancel button.
    virtual void PressButton(std::int32_t control) = 0;
    /// The "{V}" button: lets the user pick a variable and inserts its name at the caret of the
    /// control that has the focus (-1 for none); selected text stays. A control other than an
    /// edit is an error once a name was picked. `caret` counts UTF-16 units; the result is the
    /// caret after the insertion, to be set after ControlChanged has brought the text.
    virtual std::int32_t PressInsertVariable(std::int32_t active_control, std::int32_t caret) = 0;
};

/// How a form is shown.
struct TFormShowOptions {
    std::int32_t scale_percent = 100;  ///< 100 to 250
    /// The host's main window as the host gave it (a window handle on Windows, of no use
    /// elsewhere), or nil. The form is centred over it and modal to it.
    void* main_window = nullptr;
};

/// A toolkit that can show forms.
class IActionFormToolkit {
public:
    virtual ~IActionFormToolkit() = default;
    /// Shows the form and returns when its window has closed; what the user decided is the form's
    /// result. False with a sentence in `reason` when no window could be shown.
    [[nodiscard]] virtual bool ShowModal(IActionForm& form, const TFormShowOptions& options,
                                         std::u16string& reason) = 0;
};

/// Finds the toolkit, loading it when that is needed; nil with a sentence in `reason` when there
/// is none. The toolkit lives to the end of the process.
using TFormToolkitProvider = IActionFormToolkit* (*)(std::u16string& reason);

/// Installs the way to the toolkit for the process; nil takes it away again. Done at start.
void InstallFormToolkit(TFormToolkitProvider provider);

}  // namespace zm
