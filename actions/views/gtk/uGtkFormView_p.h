#pragma once

#include <gtk/gtk.h>

#include <cstdint>
#include <string>
#include <vector>

#include "actions/uActionForms.h"

namespace zm {

/// Widgets of one control. A radio group's frame and its buttons are siblings, so that the buttons
/// can stand where the form's layout puts them.
struct TControlWidgets {
    GtkWidget* main = nullptr;
    std::vector<GtkWidget*> items;
};

/// Horizontal and vertical scale of the layout in percent.
struct TLayoutScale {
    std::int32_t x = 100;
    std::int32_t y = 100;
};

/// The window of one form. Each widget that stands for a control carries the control's name as
/// its widget name; radio buttons have the item's number behind it.
class TGtkFormView : public IActionFormView {
public:
    TGtkFormView(IActionForm& form, const TFormShowOptions& options);
    ~TGtkFormView() override;
    TGtkFormView(const TGtkFormView&) = delete;
    TGtkFormView& operator=(const TGtkFormView&) = delete;

    /// Shows the window and returns when it has closed.
    void Run();

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
    /// The control that a widget stands for, -1 for none.
    std::int32_t ControlOf(GtkWidget* widget) const;
    TControlWidgets& Widgets(std::int32_t control);

    void BuildWindow();
    void BuildControl(std::int32_t control);
    void ConnectControl(std::int32_t control);
    void ConnectMnemonics();
    TLayoutScale FittingScale() const;
    void SizeWindow();
    void PlaceControls(const GtkAllocation& area);

    /// Brings what has changed of a control's state into its widgets.
    void ShowControl(std::int32_t control, std::uint8_t changes);
    void ShowText(std::int32_t control);
    void ShowEditText(GtkEntry* entry, const std::u16string& text);
    void ShowIndex(std::int32_t control);
    void ShowColorBox(std::int32_t control);
    void ShowHelp();
    void InsertVariable();

    // Signals of the toolkit; `user` is the view.
    static void OnPlace(GtkWidget* area, GtkAllocation* allocation, gpointer user);
    static void OnEditChanged(GtkWidget* entry, gpointer user);
    static void OnClearPressed(GtkWidget* entry, gint, GdkEvent*, gpointer user);
    static void OnListChanged(GtkWidget* list, gpointer user);
    static void OnColorChosen(GtkWidget* list, gpointer user);
    static gboolean OnCustomColor(gpointer user);
    static void OnRadioToggled(GtkWidget* button, gpointer user);
    static void OnCheckToggled(GtkWidget* button, gpointer user);
    static void OnButtonClicked(GtkWidget* button, gpointer user);
    static gboolean OnDrawSample(GtkWidget* panel, cairo_t* context, gpointer user);
    static gboolean OnKeyPress(GtkWidget* window, GdkEventKey* event, gpointer user);
    static gboolean OnDelete(GtkWidget* window, GdkEvent* event, gpointer user);
    static void OnDestroy(GtkWidget* window, gpointer user);

    IActionForm& form_;
    std::int32_t font_scale_;
    TLayoutScale scale_;
    std::vector<TControlWidgets> widgets_;
    GtkWidget* window_ = nullptr;
    GtkWidget* area_ = nullptr;
    GMainLoop* loop_ = nullptr;
    /// Above 0 while the view itself changes widgets: their signals are then no user's act.
    int syncing_ = 0;
    guint custom_color_source_ = 0;
    std::int32_t custom_color_control_ = -1;
};

/// A control's widgets, unplaced and with the caption as declared.
TControlWidgets NewControlWidgets(const TFormControl& control);
/// The common look of all forms; made once for the process.
void InstallFormStyle();
/// Gives a colour box, or takes from it, a row below its items for a colour without a name.
void ShowCustomRow(GtkWidget* box, const TFormControl& control, const TColor* custom);
/// Draws the text in the panel's font, centred and cut at the panel's edges.
void DrawSampleText(GtkWidget* panel, cairo_t* context, const TFormControlState& state);

/// A stored colour on screen. System colours, which only Windows defines, show as its classic
/// ones.
GdkRGBA ScreenColor(TColor color);
TColor StoredColor(const GdkRGBA& color);
/// Font with family, size, weight and slant; the caller frees it.
PangoFontDescription* NewFontDescription(const TFormFont& font);
/// Underline and strike-out; the caller releases it.
PangoAttrList* NewFontLines(const TFormFont& font);

// The pickers, modal to `parent`.
bool RunFilePicker(GtkWindow* parent, TFilePick pick, const std::vector<TFileFilter>& filters,
                   const std::u16string& initial_folder, std::u16string& file_name);
bool RunFontPicker(GtkWindow* parent, TFormFont& font);
bool RunColorPicker(GtkWindow* parent, TColor& color);
void RunMessage(GtkWindow* parent, GtkMessageType type, const std::u16string& text,
                const std::u16string& details);

}  // namespace zm
