#include <algorithm>

#include "actions/uActionFormLayout.h"
#include "actions/uColorNames.h"
#include "actions/views/gtk/uGtkFormView_p.h"
#include "actions/views/gtk/uGtkTexts.h"
#include "actions/views/uFormViewParts_p.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/platform/screen.h"

/// Making the widgets of the controls, their look, and what they draw themselves.
namespace zm {
namespace {

constexpr char kFormClass[] = "zalmo-form";
/// The toolkit's usual controls are a third higher than the form's rows. Their fonts, colours and
/// frames stay the theme's.
constexpr char kFormStyle[] =
    ".zalmo-form button, .zalmo-form entry, .zalmo-form combobox button {"
    " min-height: 0; min-width: 0; padding-top: 1px; padding-bottom: 1px; }"
    ".zalmo-form entry { padding-left: 6px; padding-right: 6px; }"
    ".zalmo-form button { padding-left: 4px; padding-right: 4px; }"
    ".zalmo-form combobox button { padding-left: 6px; padding-right: 4px; }"
    ".zalmo-form combobox cellview { min-height: 0; }"
    ".zalmo-form radiobutton, .zalmo-form checkbutton { padding: 0; }"
    ".zalmo-form radio, .zalmo-form check { min-width: 1.05em; min-height: 1.05em; }"
    ".zalmo-form radio + label, .zalmo-form check + label { margin-left: 0.1em; }";

constexpr int kSwatchSize = 14;

/// Columns of a colour box's model.
enum TColorColumn : std::uint8_t { ccSwatch, ccName, ccCount };

constexpr std::uint32_t kSystemColorMark = 0xFF000000;

std::uint32_t PlainColor(TColor color) {
    const auto value = static_cast<std::uint32_t>(color);
    const std::uint32_t number = value & ~kSystemColorMark;
    const bool is_system = (value & kSystemColorMark) == kSystemColorMark;
    // Numbers beyond those of the system's have no colour.
    return is_system ? platform::SystemColor(static_cast<std::uint8_t>(std::min(number, 0xFFU)))
                     : number;
}

GdkPixbuf* NewSwatch(TColor color) {
    GdkPixbuf* const swatch =
        gdk_pixbuf_new(GDK_COLORSPACE_RGB, FALSE, 8, kSwatchSize, kSwatchSize);
    gdk_pixbuf_fill(swatch, 0x606060FF);
    const std::uint32_t bgr = PlainColor(color);
    const std::uint32_t rgba =
        (bgr & 0xFF) << 24 | (bgr & 0xFF00) << 8 | (bgr >> 8 & 0xFF00) | 0xFF;
    GdkPixbuf* const inside =
        gdk_pixbuf_new_subpixbuf(swatch, 1, 1, kSwatchSize - 2, kSwatchSize - 2);
    gdk_pixbuf_fill(inside, rgba);
    g_object_unref(inside);
    return swatch;
}

void AddColorRow(GtkListStore* rows, const TColor* color, const std::u16string& name) {
    GdkPixbuf* const swatch = color == nullptr ? nullptr : NewSwatch(*color);
    gtk_list_store_insert_with_values(rows, nullptr, -1, ccSwatch, swatch, ccName,
                                      ViewText(name).c_str(), -1);
    if (swatch != nullptr) {
        g_object_unref(swatch);
    }
}

GtkWidget* NewColorBox(const TFormControl& control) {
    GtkListStore* const rows = gtk_list_store_new(ccCount, GDK_TYPE_PIXBUF, G_TYPE_STRING);
    GtkWidget* const box = gtk_combo_box_new_with_model(GTK_TREE_MODEL(rows));
    g_object_unref(rows);
    GtkCellLayout* const cells = GTK_CELL_LAYOUT(box);
    GtkCellRenderer* const swatch = gtk_cell_renderer_pixbuf_new();
    g_object_set(swatch, "width", kSwatchSize + 8, "xalign", 0.0, nullptr);
    gtk_cell_layout_pack_start(cells, swatch, FALSE);
    gtk_cell_layout_add_attribute(cells, swatch, "pixbuf", ccSwatch);
    GtkCellRenderer* const name = gtk_cell_renderer_text_new();
    gtk_cell_layout_pack_start(cells, name, TRUE);
    gtk_cell_layout_add_attribute(cells, name, "text", ccName);
    for (std::size_t item = 0; item < control.items.size(); ++item) {
        const TColor color = ColorBoxColor(static_cast<std::int32_t>(item));
        AddColorRow(rows, item == 0 ? nullptr : &color, control.items[item]);
    }
    return box;
}

GtkWidget* NewLabel(const TFormControl& control) {
    GtkWidget* const label = gtk_label_new_with_mnemonic(MnemonicText(control.caption).c_str());
    gtk_label_set_xalign(GTK_LABEL(label), 0.0F);
    if (control.kind == fcWrappedLabel) {
        gtk_label_set_line_wrap(GTK_LABEL(label), TRUE);
        // Its width is the form's, and not that of the whole text in one line.
        gtk_label_set_max_width_chars(GTK_LABEL(label), 1);
        gtk_label_set_yalign(GTK_LABEL(label), 0.0F);
    }
    return label;
}

GtkWidget* NewEdit() {
    GtkWidget* const edit = gtk_entry_new();
    gtk_entry_set_activates_default(GTK_ENTRY(edit), TRUE);
    // The form's rows give the width, and a pasted text ends where its first line does.
    gtk_entry_set_width_chars(GTK_ENTRY(edit), 1);
    g_object_set(edit, "truncate-multiline", TRUE, nullptr);
    return edit;
}

GtkWidget* NewComboBox(const TFormControl& control) {
    GtkWidget* const list = gtk_combo_box_text_new();
    for (const std::u16string& item : control.items) {
        gtk_combo_box_text_append_text(GTK_COMBO_BOX_TEXT(list), ViewText(item).c_str());
    }
    return list;
}

GtkWidget* NewSamplePanel() {
    GtkWidget* const frame = gtk_frame_new(nullptr);
    gtk_frame_set_shadow_type(GTK_FRAME(frame), GTK_SHADOW_IN);
    gtk_container_add(GTK_CONTAINER(frame), gtk_drawing_area_new());
    return frame;
}

GtkWidget* NewButton(const TFormControl& control) {
    GtkWidget* const button = gtk_button_new_with_mnemonic(MnemonicText(control.caption).c_str());
    if (control.kind == fcSpeedButton) {
        gtk_widget_set_can_focus(button, FALSE);
        gtk_widget_set_focus_on_click(button, FALSE);
        gtk_button_set_relief(GTK_BUTTON(button), GTK_RELIEF_NONE);
    }
    gtk_widget_set_can_default(button, control.button == fbOk ? TRUE : FALSE);
    return button;
}

TControlWidgets NewRadioGroup(const TFormControl& control) {
    TControlWidgets widgets{gtk_frame_new(ViewText(control.caption).c_str()), {}};
    for (const std::u16string& item : control.items) {
        GtkRadioButton* const first =
            widgets.items.empty() ? nullptr : GTK_RADIO_BUTTON(widgets.items.front());
        widgets.items.push_back(
            gtk_radio_button_new_with_mnemonic_from_widget(first, MnemonicText(item).c_str()));
        const std::string name = ViewText(control.name) + std::to_string(widgets.items.size() - 1);
        gtk_widget_set_name(widgets.items.back(), name.c_str());
    }
    return widgets;
}

TControlWidgets NewUnnamedWidgets(const TFormControl& control) {
    switch (control.kind) {
        case fcLabel:
        case fcWrappedLabel: return {NewLabel(control), {}};
        case fcEdit: return {NewEdit(), {}};
        case fcComboBox: return {NewComboBox(control), {}};
        case fcRadioGroup: return NewRadioGroup(control);
        case fcCheckBox:
            return {gtk_check_button_new_with_mnemonic(MnemonicText(control.caption).c_str()), {}};
        case fcColorBox: return {NewColorBox(control), {}};
        case fcSamplePanel: return {NewSamplePanel(), {}};
        case fcButton:
        case fcSpeedButton: break;
    }
    return {NewButton(control), {}};
}

}  // namespace

TControlWidgets NewControlWidgets(const TFormControl& control) {
    TControlWidgets widgets = NewUnnamedWidgets(control);
    gtk_widget_set_name(widgets.main, ViewText(control.name).c_str());
    if (!control.hint.empty()) {
        gtk_widget_set_tooltip_text(widgets.main, ViewText(control.hint).c_str());
    }
    return widgets;
}

void InstallFormStyle() {
    static bool installed = false;
    if (!installed) {
        installed = true;
        GtkCssProvider* const provider = gtk_css_provider_new();
        gtk_css_provider_load_from_data(provider, kFormStyle, -1, nullptr);
        gtk_style_context_add_provider_for_screen(gdk_screen_get_default(),
                                                  GTK_STYLE_PROVIDER(provider),
                                                  GTK_STYLE_PROVIDER_PRIORITY_APPLICATION);
        g_object_unref(provider);
    }
}

void ShowCustomRow(GtkWidget* box, const TFormControl& control, const TColor* custom) {
    GtkTreeModel* const model = gtk_combo_box_get_model(GTK_COMBO_BOX(box));
    GtkTreeIter row{};
    const auto place = static_cast<int>(control.items.size());
    // The other rows stay: the user may be choosing one of them at this moment.
    if (gtk_tree_model_iter_nth_child(model, &row, nullptr, place) != FALSE) {
        gtk_list_store_remove(GTK_LIST_STORE(model), &row);
    }
    if (custom != nullptr) {
        AddColorRow(GTK_LIST_STORE(model), custom, u"Custom");
    }
}

void DrawSampleText(GtkWidget* panel, cairo_t* context, const TFormControlState& state) {
    const std::u16string start = state.text.substr(0, kMaxSampleLength);
    PangoLayout* const layout = gtk_widget_create_pango_layout(panel, ViewText(start).c_str());
    PangoFontDescription* const font = NewFontDescription(state.font);
    PangoAttrList* const lines = NewFontLines(state.font);
    pango_layout_set_font_description(layout, font);
    pango_layout_set_attributes(layout, lines);
    pango_layout_set_single_paragraph_mode(layout, TRUE);
    int width = 0;
    int height = 0;
    pango_layout_get_pixel_size(layout, &width, &height);
    const GdkRGBA color = ScreenColor(state.font.color);
    gdk_cairo_set_source_rgba(context, &color);
    // In whole pixels, so that letters stay sharp.
    const int left = (gtk_widget_get_allocated_width(panel) - width) / 2;
    const int top = (gtk_widget_get_allocated_height(panel) - height) / 2;
    cairo_move_to(context, left, top);
    pango_cairo_show_layout(context, layout);
    pango_attr_list_unref(lines);
    pango_font_description_free(font);
    g_object_unref(layout);
}

GdkRGBA ScreenColor(TColor color) {
    const std::uint32_t bgr = PlainColor(color);
    return {(bgr & 0xFF) / 255.0, (bgr >> 8 & 0xFF) / 255.0, (bgr >> 16 & 0xFF) / 255.0, 1.0};
}

TColor StoredColor(const GdkRGBA& color) {
    const auto level = [](double part) { return RoundHalfEven(std::clamp(part, 0.0, 1.0) * 255); };
    return level(color.blue) << 16 | level(color.green) << 8 | level(color.red);
}

}  // namespace zm
