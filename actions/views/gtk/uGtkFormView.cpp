#include "actions/views/gtk/uGtkFormView_p.h"

#include <algorithm>

#include "actions/uActionFormLayout.h"
#include "actions/views/gtk/uGtkTexts.h"
#include "actions/views/uFormViewParts_p.h"

namespace zm {
namespace {

/// Pixels that a label may be higher than its row has it: the gap to its field.
constexpr std::int32_t kLabelSlack = 2;
constexpr char kControlKey[] = "zalmo-control";
/// The toolkit's entries hold no more bytes than this.
constexpr std::size_t kMaxEntryBytes = 65534;

TGtkFormView& ViewOf(gpointer user) {
    return *static_cast<TGtkFormView*>(user);
}

/// The program's own window that the user is in, so that a form stands before it.
GtkWindow* ActiveWindow() {
    GList* const windows = gtk_window_list_toplevels();
    GtkWindow* active = nullptr;
    for (GList* node = windows; node != nullptr; node = node->next) {
        GtkWindow* const window = GTK_WINDOW(node->data);
        const bool shown = gtk_widget_get_visible(GTK_WIDGET(window)) != FALSE &&
                           gtk_window_get_window_type(window) == GTK_WINDOW_TOPLEVEL;
        if (shown && (active == nullptr || gtk_window_is_active(window) != FALSE)) {
            active = window;
        }
    }
    g_list_free(windows);
    return active;
}

/// Percent that a natural length needs in place of the design's.
std::int32_t NeededPercent(std::int32_t natural, std::int32_t design) {
    return design <= 0 ? 0 : (natural * 100 + design - 1) / design;
}

void SetFontScale(GtkWidget* window, std::int32_t percent) {
    const std::string style = "window { font-size: " + std::to_string(percent) + "%; }";
    GtkCssProvider* const provider = gtk_css_provider_new();
    gtk_css_provider_load_from_data(provider, style.c_str(), -1, nullptr);
    gtk_style_context_add_provider(gtk_widget_get_style_context(window),
                                   GTK_STYLE_PROVIDER(provider),
                                   GTK_STYLE_PROVIDER_PRIORITY_APPLICATION);
    g_object_unref(provider);
}

TRect PlaceOf(const TActionFormDesign& design, const TFormControl& control, TLayoutScale scale,
              const GtkAllocation& area) {
    const TRect across = PlaceControl(design, control, scale.x, area.width, area.height);
    const TRect down = PlaceControl(design, control, scale.y, area.width, area.height);
    return {across.left, down.top, across.right, down.bottom};
}

void PlaceWidget(GtkWidget* widget, const GtkAllocation& area, const TRect& place) {
    GtkAllocation allocation{area.x + place.left, area.y + place.top,
                             std::max(place.right - place.left, 1),
                             std::max(place.bottom - place.top, 1)};
    // The toolkit wants to be asked before it is told.
    GtkRequisition smallest{};
    gtk_widget_get_preferred_size(widget, &smallest, nullptr);
    if (GTK_IS_LABEL(widget) && gtk_label_get_line_wrap(GTK_LABEL(widget)) == FALSE) {
        const int growth = std::max(smallest.height - allocation.height, 0);
        allocation.y -= growth / 2;
        allocation.height += growth;
    }
    gtk_widget_size_allocate(widget, &allocation);
}

}  // namespace

TGtkFormView::TGtkFormView(IActionForm& form, const TFormShowOptions& options)
    : form_(form),
      font_scale_(options.scale_percent),
      scale_{options.scale_percent, options.scale_percent},
      widgets_(form.Design().controls.size()) {
    InstallFormStyle();
    BuildWindow();
    scale_ = FittingScale();
    SizeWindow();
    form_.AttachView(this);
}

TGtkFormView::~TGtkFormView() {
    form_.AttachView(nullptr);
    if (custom_color_source_ != 0) {
        g_source_remove(custom_color_source_);
    }
    if (window_ != nullptr) {
        gtk_widget_destroy(window_);
    }
    // Nobody may run the toolkit's events from here on.
    gdk_display_flush(gdk_display_get_default());
}

const TFormControl& TGtkFormView::Control(std::int32_t control) const {
    return form_.Design().controls[static_cast<std::size_t>(control)];
}

TControlWidgets& TGtkFormView::Widgets(std::int32_t control) {
    return widgets_[static_cast<std::size_t>(control)];
}

std::int32_t TGtkFormView::ControlOf(GtkWidget* widget) const {
    for (; widget != nullptr; widget = gtk_widget_get_parent(widget)) {
        if (gpointer mark = g_object_get_data(G_OBJECT(widget), kControlKey)) {
            return GPOINTER_TO_INT(mark) - 1;
        }
    }
    return -1;
}

void TGtkFormView::BuildWindow() {
    const TActionFormDesign& design = form_.Design();
    GtkWindow* const owner = ActiveWindow();
    window_ = gtk_window_new(GTK_WINDOW_TOPLEVEL);
    GtkWindow* const window = GTK_WINDOW(window_);
    gtk_widget_set_name(window_, ViewText(design.class_name).c_str());
    gtk_style_context_add_class(gtk_widget_get_style_context(window_), "zalmo-form");
    SetFontScale(window_, font_scale_);
    gtk_window_set_title(window, ViewText(design.caption).c_str());
    gtk_window_set_type_hint(window, GDK_WINDOW_TYPE_HINT_DIALOG);
    gtk_window_set_transient_for(window, owner);
    gtk_window_set_position(window,
                            owner == nullptr ? GTK_WIN_POS_CENTER : GTK_WIN_POS_CENTER_ON_PARENT);
    gtk_window_set_modal(window, TRUE);
    area_ = gtk_fixed_new();
    gtk_container_add(GTK_CONTAINER(window_), area_);
    // In the order of the focus, which is also the one that screen readers tell them in.
    for (const std::int32_t control : TabOrder(design)) {
        BuildControl(control);
    }
    ConnectMnemonics();
    gtk_widget_show_all(area_);
    g_signal_connect(area_, "size-allocate", G_CALLBACK(&OnPlace), this);
    // Behind the controls, for which a key may mean something: an input method, say.
    g_signal_connect_after(window_, "key-press-event", G_CALLBACK(&OnKeyPress), this);
    g_signal_connect(window_, "delete-event", G_CALLBACK(&OnDelete), this);
    g_signal_connect(window_, "destroy", G_CALLBACK(&OnDestroy), this);
}

void TGtkFormView::BuildControl(std::int32_t control) {
    TControlWidgets& widgets = Widgets(control);
    widgets = NewControlWidgets(Control(control));
    std::vector<GtkWidget*> all{widgets.main};
    all.insert(all.end(), widgets.items.begin(), widgets.items.end());
    for (GtkWidget* widget : all) {
        g_object_set_data(G_OBJECT(widget), kControlKey, GINT_TO_POINTER(control + 1));
        gtk_fixed_put(GTK_FIXED(area_), widget, 0, 0);
    }
    ConnectControl(control);
    ShowControl(control, kAllFormChanges);
    if (Control(control).button == fbOk) {
        gtk_window_set_default(GTK_WINDOW(window_), widgets.main);
    }
}

void TGtkFormView::ConnectControl(std::int32_t control) {
    const TControlWidgets& widgets = Widgets(control);
    switch (Control(control).kind) {
        case fcEdit:
            g_signal_connect(widgets.main, "changed", G_CALLBACK(&OnEditChanged), this);
            g_signal_connect(widgets.main, "icon-release", G_CALLBACK(&OnClearPressed), this);
            break;
        case fcComboBox:
            g_signal_connect(widgets.main, "changed", G_CALLBACK(&OnListChanged), this);
            break;
        case fcColorBox:
            g_signal_connect(widgets.main, "changed", G_CALLBACK(&OnColorChosen), this);
            break;
        case fcCheckBox:
            g_signal_connect(widgets.main, "toggled", G_CALLBACK(&OnCheckToggled), this);
            break;
        case fcSamplePanel:
            g_signal_connect(gtk_bin_get_child(GTK_BIN(widgets.main)), "draw",
                             G_CALLBACK(&OnDrawSample), this);
            break;
        case fcButton:
        case fcSpeedButton:
            g_signal_connect(widgets.main, "clicked", G_CALLBACK(&OnButtonClicked), this);
            break;
        default: break;
    }
    for (GtkWidget* item : widgets.items) {
        g_signal_connect(item, "toggled", G_CALLBACK(&OnRadioToggled), this);
    }
}

void TGtkFormView::ConnectMnemonics() {
    const std::vector<TFormControl>& controls = form_.Design().controls;
    for (std::size_t label = 0; label < controls.size(); ++label) {
        for (std::size_t target = 0; target < controls.size(); ++target) {
            const std::u16string& named = controls[label].focus_control;
            if (!named.empty() && controls[target].name == named) {
                gtk_label_set_mnemonic_widget(GTK_LABEL(widgets_[label].main),
                                              widgets_[target].main);
            }
        }
    }
}

/// The scale asked for, or more where a font or theme needs more room than the design has.
TLayoutScale TGtkFormView::FittingScale() const {
    TLayoutScale scale = scale_;
    const auto fit_width = [&scale](GtkWidget* widget, std::int32_t design_width) {
        int natural = 0;
        gtk_widget_get_preferred_width(widget, nullptr, &natural);
        scale.x = std::max(scale.x, NeededPercent(natural, design_width));
    };
    const auto fit_height = [&scale](GtkWidget* widget, const TRect& bounds, std::int32_t slack) {
        int needed = 0;
        gtk_widget_get_preferred_height_for_width(
            widget, ScaleLength(bounds.right - bounds.left, scale.x), nullptr, &needed);
        scale.y = std::max(scale.y, NeededPercent(needed - slack, bounds.bottom - bounds.top));
    };
    const std::vector<TFormControl>& controls = form_.Design().controls;
    for (std::size_t index = 0; index < controls.size(); ++index) {
        const TRect& bounds = controls[index].bounds;
        const bool takes_any = controls[index].kind == fcEdit ||
                               controls[index].kind == fcWrappedLabel ||
                               controls[index].kind == fcSamplePanel;
        if (!takes_any) {
            fit_width(widgets_[index].main, bounds.right - bounds.left);
        }
        const std::vector<TRect> places = RadioItemPlaces(controls[index], 100);
        for (std::size_t item = 0; item < widgets_[index].items.size(); ++item) {
            fit_width(widgets_[index].items[item], places[item].right - places[item].left);
        }
    }
    for (std::size_t index = 0; index < controls.size(); ++index) {
        const bool is_label = controls[index].kind == fcLabel;
        fit_height(widgets_[index].main, controls[index].bounds, is_label ? kLabelSlack : 0);
    }
    return scale;
}

void TGtkFormView::SizeWindow() {
    const TActionFormDesign& design = form_.Design();
    const std::int32_t width = ScaleLength(design.client_width, scale_.x);
    const std::int32_t height = ScaleLength(design.client_height, scale_.y);
    for (std::size_t index = 0; index < design.controls.size(); ++index) {
        const TRect& bounds = design.controls[index].bounds;
        if (design.controls[index].kind == fcWrappedLabel) {
            gtk_widget_set_size_request(
                widgets_[index].main,
                ScaleLength(bounds.right, scale_.x) - ScaleLength(bounds.left, scale_.x),
                ScaleLength(bounds.bottom, scale_.y) - ScaleLength(bounds.top, scale_.y));
        }
    }
    if (design.border != fbsSizeable) {
        gtk_widget_set_size_request(area_, width, height);
        gtk_window_set_resizable(GTK_WINDOW(window_), FALSE);
        return;
    }
    gtk_widget_set_size_request(
        area_, ScaleLength(std::max(design.min_window_width - kDesignFrameWidth, 0), scale_.x),
        ScaleLength(std::max(design.min_window_height - kDesignFrameHeight, 0), scale_.y));
    gtk_window_set_default_size(GTK_WINDOW(window_), width, height);
}

void TGtkFormView::PlaceControls(const GtkAllocation& area) {
    const TActionFormDesign& design = form_.Design();
    for (std::size_t index = 0; index < design.controls.size(); ++index) {
        const TFormControl& control = design.controls[index];
        const TRect place = PlaceOf(design, control, scale_, area);
        PlaceWidget(widgets_[index].main, area, place);
        const std::vector<TRect> across = RadioItemPlaces(control, scale_.x);
        const std::vector<TRect> down = RadioItemPlaces(control, scale_.y);
        for (std::size_t item = 0; item < widgets_[index].items.size(); ++item) {
            PlaceWidget(widgets_[index].items[item], area,
                        {place.left + across[item].left, place.top + down[item].top,
                         place.left + across[item].right, place.top + down[item].bottom});
        }
    }
}

void TGtkFormView::Run() {
    loop_ = g_main_loop_new(nullptr, FALSE);
    gtk_window_present(GTK_WINDOW(window_));
    g_main_loop_run(loop_);
    g_main_loop_unref(loop_);
    loop_ = nullptr;
}

void TGtkFormView::CloseWindow() {
    gtk_widget_hide(window_);
    if (loop_ != nullptr) {
        g_main_loop_quit(loop_);
    }
}

void TGtkFormView::ControlChanged(std::int32_t control, std::uint8_t changes) {
    ShowControl(control, changes);
}

void TGtkFormView::ShowControl(std::int32_t control, std::uint8_t changes) {
    const TSyncGuard guard(syncing_);
    const TFormControlState& state = form_.State(control);
    const TControlWidgets& widgets = Widgets(control);
    if ((changes & fchText) != 0) {
        ShowText(control);
    }
    if ((changes & (fchIndex | fchColor)) != 0) {
        ShowIndex(control);
    }
    if ((changes & fchChecked) != 0 && Control(control).kind == fcCheckBox) {
        gtk_toggle_button_set_active(GTK_TOGGLE_BUTTON(widgets.main), state.checked ? TRUE : FALSE);
    }
    if ((changes & fchEnabled) != 0) {
        gtk_widget_set_sensitive(widgets.main, state.enabled ? TRUE : FALSE);
        for (GtkWidget* item : widgets.items) {
            gtk_widget_set_sensitive(item, state.enabled ? TRUE : FALSE);
        }
    }
    if ((changes & fchFont) != 0 && Control(control).kind == fcSamplePanel) {
        gtk_widget_queue_draw(widgets.main);
    }
}

void TGtkFormView::ShowText(std::int32_t control) {
    GtkWidget* const widget = Widgets(control).main;
    const std::u16string& text = form_.State(control).text;
    switch (Control(control).kind) {
        case fcEdit: ShowEditText(GTK_ENTRY(widget), text); break;
        case fcLabel:
        case fcWrappedLabel:
            gtk_label_set_text_with_mnemonic(GTK_LABEL(widget), MnemonicText(text).c_str());
            break;
        case fcCheckBox:
        case fcButton:
        case fcSpeedButton:
            gtk_button_set_label(GTK_BUTTON(widget), MnemonicText(text).c_str());
            break;
        case fcSamplePanel: gtk_widget_queue_draw(widget); break;
        default: break;
    }
}

/// A text that an entry cannot hold is shown by its beginning and not edited, so that nothing of
/// it gets lost; the icon empties the edit.
void TGtkFormView::ShowEditText(GtkEntry* entry, const std::u16string& text) {
    const std::string shown = ViewText(text);
    const bool fits = shown.size() <= kMaxEntryBytes;
    if (shown != gtk_entry_get_text(entry)) {
        gtk_entry_set_text(entry, shown.c_str());
    }
    gtk_editable_set_editable(GTK_EDITABLE(entry), fits ? TRUE : FALSE);
    gtk_entry_set_icon_from_icon_name(entry, GTK_ENTRY_ICON_SECONDARY,
                                      fits ? nullptr : "edit-clear-symbolic");
    if (!fits) {
        gtk_entry_set_icon_tooltip_text(entry, GTK_ENTRY_ICON_SECONDARY,
                                        "This text is too long to be edited here. "
                                        "Press to remove it.");
    }
}

void TGtkFormView::ShowIndex(std::int32_t control) {
    const TControlWidgets& widgets = Widgets(control);
    const std::int32_t index = form_.State(control).index;
    switch (Control(control).kind) {
        case fcComboBox: gtk_combo_box_set_active(GTK_COMBO_BOX(widgets.main), index); break;
        case fcRadioGroup:
            gtk_toggle_button_set_active(
                GTK_TOGGLE_BUTTON(widgets.items[static_cast<std::size_t>(index)]), TRUE);
            break;
        case fcColorBox: ShowColorBox(control); break;
        default: break;
    }
}

/// Required: a colour without a name has a row of its own below the items. The toolkit tells of
/// changes only, and so "Custom..." can be chosen again.
void TGtkFormView::ShowColorBox(std::int32_t control) {
    GtkWidget* const box = Widgets(control).main;
    const TFormControlState& state = form_.State(control);
    const bool custom = state.index == 0;
    ShowCustomRow(box, Control(control), custom ? &state.color : nullptr);
    gtk_combo_box_set_active(
        GTK_COMBO_BOX(box), custom ? static_cast<int>(Control(control).items.size()) : state.index);
}

bool TGtkFormView::PickFile(TFilePick pick, const std::vector<TFileFilter>& filters,
                            const std::u16string& initial_folder, std::u16string& file_name) {
    return RunFilePicker(GTK_WINDOW(window_), pick, filters, initial_folder, file_name);
}

bool TGtkFormView::PickFont(TFormFont& font) {
    return RunFontPicker(GTK_WINDOW(window_), font);
}

bool TGtkFormView::PickColor(TColor& color) {
    return RunColorPicker(GTK_WINDOW(window_), color);
}

void TGtkFormView::Beep(std::uint32_t) {
    gdk_display_beep(gtk_widget_get_display(window_));  // the display has one sound
}

void TGtkFormView::ShowError(const std::u16string& message) {
    RunMessage(GTK_WINDOW(window_), GTK_MESSAGE_ERROR, message, u"");
}

void TGtkFormView::ShowHelp() {
    const TActionFormDesign& design = form_.Design();
    const std::string page = std::to_string(design.help_context);
    RunMessage(GTK_WINDOW(window_), GTK_MESSAGE_INFO, design.caption,
               u"Page " + ModelText(page.c_str()) +
                   u" of the host's manual tells about this step.\n\n{V} puts a variable at the "
                   u"place of the caret. Variables get their values when the job runs.");
}

void TGtkFormView::InsertVariable() {
    const std::int32_t active = ControlOf(gtk_window_get_focus(GTK_WINDOW(window_)));
    const bool is_edit = active >= 0 && Control(active).kind == fcEdit;
    GtkEditable* const edit = is_edit ? GTK_EDITABLE(Widgets(active).main) : nullptr;
    std::int32_t caret = 0;
    if (is_edit) {
        caret = UnitsBefore(form_.State(active).text, gtk_editable_get_position(edit));
    }
    const std::int32_t new_caret = form_.PressInsertVariable(active, caret);
    if (is_edit && window_ != nullptr) {
        gtk_editable_set_position(edit, CharactersBefore(form_.State(active).text, new_caret));
    }
}

void TGtkFormView::OnPlace(GtkWidget*, GtkAllocation* allocation, gpointer user) {
    ViewOf(user).PlaceControls(*allocation);
}

void TGtkFormView::OnEditChanged(GtkWidget* entry, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    if (view.syncing_ == 0) {
        view.form_.SetText(view.ControlOf(entry), ModelText(gtk_entry_get_text(GTK_ENTRY(entry))));
    }
}

void TGtkFormView::OnClearPressed(GtkWidget* entry, gint, GdkEvent*, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    const std::int32_t control = view.ControlOf(entry);
    view.form_.SetText(control, u"");
    view.ShowControl(control, fchText);
}

void TGtkFormView::OnListChanged(GtkWidget* list, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    if (view.syncing_ == 0) {
        view.form_.SetIndex(view.ControlOf(list), gtk_combo_box_get_active(GTK_COMBO_BOX(list)));
    }
}

void TGtkFormView::OnColorChosen(GtkWidget* list, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    if (view.syncing_ != 0) {
        return;
    }
    const int index = gtk_combo_box_get_active(GTK_COMBO_BOX(list));
    const std::int32_t control = view.ControlOf(list);
    if (index != 0) {
        view.form_.SetIndex(control, index);
    } else if (view.custom_color_source_ == 0) {
        // The list is still open and holds the pointer; the picker comes when it has closed.
        view.custom_color_control_ = control;
        view.custom_color_source_ = g_idle_add(&OnCustomColor, user);
    }
}

gboolean TGtkFormView::OnCustomColor(gpointer user) {
    TGtkFormView& view = ViewOf(user);
    view.custom_color_source_ = 0;
    view.form_.SetIndex(view.custom_color_control_, 0);
    return G_SOURCE_REMOVE;
}

void TGtkFormView::OnRadioToggled(GtkWidget* button, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    if (view.syncing_ != 0 || gtk_toggle_button_get_active(GTK_TOGGLE_BUTTON(button)) == FALSE) {
        return;
    }
    const std::int32_t control = view.ControlOf(button);
    const std::vector<GtkWidget*>& items = view.Widgets(control).items;
    const auto item = std::find(items.begin(), items.end(), button) - items.begin();
    view.form_.SetIndex(control, static_cast<std::int32_t>(item));
}

void TGtkFormView::OnCheckToggled(GtkWidget* button, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    if (view.syncing_ == 0) {
        view.form_.SetChecked(view.ControlOf(button),
                              gtk_toggle_button_get_active(GTK_TOGGLE_BUTTON(button)) != FALSE);
    }
}

void TGtkFormView::OnButtonClicked(GtkWidget* button, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    const std::int32_t control = view.ControlOf(button);
    if (view.Control(control).button == fbVariable) {
        view.InsertVariable();
    } else {
        view.form_.PressButton(control);
    }
}

gboolean TGtkFormView::OnDrawSample(GtkWidget* panel, cairo_t* context, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    DrawSampleText(panel, context, view.form_.State(view.ControlOf(panel)));
    return GDK_EVENT_STOP;
}

gboolean TGtkFormView::OnKeyPress(GtkWidget*, GdkEventKey* event, gpointer user) {
    if (event->keyval == GDK_KEY_Escape) {
        PressFormButton(ViewOf(user).form_, fbCancel);
        return GDK_EVENT_STOP;
    }
    if (event->keyval == GDK_KEY_F1) {
        ViewOf(user).ShowHelp();
        return GDK_EVENT_STOP;
    }
    return GDK_EVENT_PROPAGATE;
}

gboolean TGtkFormView::OnDelete(GtkWidget*, GdkEvent*, gpointer user) {
    PressFormButton(ViewOf(user).form_, fbCancel);
    return GDK_EVENT_STOP;
}

void TGtkFormView::OnDestroy(GtkWidget*, gpointer user) {
    TGtkFormView& view = ViewOf(user);
    view.window_ = nullptr;
    if (view.loop_ != nullptr) {
        g_main_loop_quit(view.loop_);
    }
}

}  // namespace zm
