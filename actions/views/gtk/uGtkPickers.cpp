#include <cmath>

#include "actions/uActionFormLayout.h"
#include "actions/views/gtk/uGtkFormView_p.h"
#include "actions/views/gtk/uGtkTexts.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstrings.h"

/// File, font and colour pickers of the toolkit, and its message box.
namespace zm {
namespace {

constexpr int kPickerSpacing = 12;

/// "*.[jJ][pP][gG]": patterns of the toolkit tell cases apart.
std::string PatternWithoutCase(const std::string& extension) {
    std::string pattern = "*.";
    for (const char letter : extension) {
        const std::string both =
            AsciiLower(std::string(1, letter)) + AsciiUpper(std::string(1, letter));
        pattern += both[0] == both[1] ? std::string(1, letter) : "[" + both + "]";
    }
    return pattern;
}

GtkFileFilter* NewFilter(const TFileFilter& filter) {
    GtkFileFilter* const made = gtk_file_filter_new();
    gtk_file_filter_set_name(made, ViewText(filter.name).c_str());
    for (const std::u16string& extension : filter.extensions) {
        gtk_file_filter_add_pattern(made, PatternWithoutCase(ViewText(extension)).c_str());
    }
    if (filter.extensions.empty()) {
        gtk_file_filter_add_pattern(made, "*");
    }
    return made;
}

/// What the font picker of the toolkit lacks: underline, strike-out and colour, in a row below it.
struct TFontExtras {
    GtkWidget* underline;
    GtkWidget* strike_out;
    GtkWidget* color;
};

TFontExtras AddFontExtras(GtkWidget* dialog, const TFormFont& font) {
    const GdkRGBA color = ScreenColor(font.color);
    const TFontExtras extras{gtk_check_button_new_with_mnemonic("_Underline"),
                             gtk_check_button_new_with_mnemonic("Stri_ke out"),
                             gtk_color_button_new_with_rgba(&color)};
    gtk_toggle_button_set_active(GTK_TOGGLE_BUTTON(extras.underline),
                                 (font.styles & ffUnderline) != 0);
    gtk_toggle_button_set_active(GTK_TOGGLE_BUTTON(extras.strike_out),
                                 (font.styles & ffStrikeOut) != 0);
    GtkWidget* const row = gtk_box_new(GTK_ORIENTATION_HORIZONTAL, kPickerSpacing);
    gtk_container_set_border_width(GTK_CONTAINER(row), kPickerSpacing);
    GtkWidget* const label = gtk_label_new_with_mnemonic("_Color:");
    gtk_label_set_mnemonic_widget(GTK_LABEL(label), extras.color);
    for (GtkWidget* widget : {extras.underline, extras.strike_out, label, extras.color}) {
        gtk_box_pack_start(GTK_BOX(row), widget, FALSE, FALSE, 0);
    }
    GtkWidget* const content = gtk_dialog_get_content_area(GTK_DIALOG(dialog));
    gtk_box_pack_end(GTK_BOX(content), row, FALSE, FALSE, 0);
    gtk_widget_show_all(row);
    return extras;
}

std::uint8_t StyleBit(GtkWidget* check_button, TFormFontStyle style) {
    const bool set = gtk_toggle_button_get_active(GTK_TOGGLE_BUTTON(check_button)) != FALSE;
    return static_cast<std::uint8_t>(set ? style : 0);
}

/// What the dialog gave back, for what it was shown. A part that the user left alone stays as it
/// was stored, even where the dialog could not show it.
TFormFont ChosenFont(GtkWidget* dialog, const TFontExtras& extras, const TFormFont& before) {
    const TFormFont shown = FontToShow(before);
    TFormFont font = before;
    font.styles = static_cast<std::uint8_t>(StyleBit(extras.underline, ffUnderline) |
                                            StyleBit(extras.strike_out, ffStrikeOut));
    GdkRGBA color{};
    gtk_color_chooser_get_rgba(GTK_COLOR_CHOOSER(extras.color), &color);
    const GdkRGBA old_color = ScreenColor(before.color);
    font.color = gdk_rgba_equal(&color, &old_color) ? before.color : StoredColor(color);
    PangoFontDescription* const chosen = gtk_font_chooser_get_font_desc(GTK_FONT_CHOOSER(dialog));
    if (chosen == nullptr) {
        return font;
    }
    const char* const family = pango_font_description_get_family(chosen);
    if (family != nullptr && ModelText(family) != shown.name) {
        font.name = ModelText(family);
    }
    const int size =
        std::max((pango_font_description_get_size(chosen) + PANGO_SCALE / 2) / PANGO_SCALE, 1);
    if (size != shown.size) {
        font.size = size;
    }
    const bool bold = pango_font_description_get_weight(chosen) >= PANGO_WEIGHT_SEMIBOLD;
    const bool italic = pango_font_description_get_style(chosen) != PANGO_STYLE_NORMAL;
    font.styles =
        static_cast<std::uint8_t>(font.styles | (bold ? ffBold : 0) | (italic ? ffItalic : 0));
    pango_font_description_free(chosen);
    return font;
}

}  // namespace

PangoFontDescription* NewFontDescription(const TFormFont& font) {
    const TFormFont shown = FontToShow(font);
    PangoFontDescription* const description = pango_font_description_new();
    pango_font_description_set_family(description, ViewText(shown.name).c_str());
    pango_font_description_set_size(description, shown.size * PANGO_SCALE);
    pango_font_description_set_weight(
        description, (shown.styles & ffBold) != 0 ? PANGO_WEIGHT_BOLD : PANGO_WEIGHT_NORMAL);
    pango_font_description_set_style(
        description, (shown.styles & ffItalic) != 0 ? PANGO_STYLE_ITALIC : PANGO_STYLE_NORMAL);
    return description;
}

PangoAttrList* NewFontLines(const TFormFont& font) {
    PangoAttrList* const lines = pango_attr_list_new();
    if ((font.styles & ffUnderline) != 0) {
        pango_attr_list_insert(lines, pango_attr_underline_new(PANGO_UNDERLINE_SINGLE));
    }
    if ((font.styles & ffStrikeOut) != 0) {
        pango_attr_list_insert(lines, pango_attr_strikethrough_new(TRUE));
    }
    return lines;
}

bool RunFilePicker(GtkWindow* parent, TFilePick pick, const std::vector<TFileFilter>& filters,
                   const std::u16string& initial_folder, std::u16string& file_name) {
    const bool opens = pick == fpOpen;
    GtkFileChooserNative* const dialog = gtk_file_chooser_native_new(
        opens ? "Open Image File" : "Save Image File", parent,
        opens ? GTK_FILE_CHOOSER_ACTION_OPEN : GTK_FILE_CHOOSER_ACTION_SAVE, nullptr, nullptr);
    GtkFileChooser* const chooser = GTK_FILE_CHOOSER(dialog);
    for (const TFileFilter& filter : filters) {
        gtk_file_chooser_add_filter(chooser, NewFilter(filter));
    }
    const std::string folder = Utf8FromUtf16(initial_folder);
    if (!folder.empty() && g_file_test(folder.c_str(), G_FILE_TEST_IS_DIR)) {
        gtk_file_chooser_set_current_folder(chooser, folder.c_str());
    }
    const bool picked = gtk_native_dialog_run(GTK_NATIVE_DIALOG(dialog)) == GTK_RESPONSE_ACCEPT;
    char* const name = picked ? gtk_file_chooser_get_filename(chooser) : nullptr;
    if (name != nullptr) {
        file_name = Utf16FromUtf8(name);
    }
    g_free(name);
    g_object_unref(dialog);
    return picked && name != nullptr;
}

bool RunFontPicker(GtkWindow* parent, TFormFont& font) {
    GtkWidget* const dialog = gtk_font_chooser_dialog_new("Font", parent);
    gtk_window_set_modal(GTK_WINDOW(dialog), TRUE);
    PangoFontDescription* const description = NewFontDescription(font);
    gtk_font_chooser_set_font_desc(GTK_FONT_CHOOSER(dialog), description);
    pango_font_description_free(description);
    const TFontExtras extras = AddFontExtras(dialog, font);
    const bool picked = gtk_dialog_run(GTK_DIALOG(dialog)) == GTK_RESPONSE_OK;
    if (picked) {
        font = ChosenFont(dialog, extras, font);
    }
    gtk_widget_destroy(dialog);
    return picked;
}

bool RunColorPicker(GtkWindow* parent, TColor& color) {
    GtkWidget* const dialog = gtk_color_chooser_dialog_new("Color", parent);
    gtk_window_set_modal(GTK_WINDOW(dialog), TRUE);
    gtk_color_chooser_set_use_alpha(GTK_COLOR_CHOOSER(dialog), FALSE);
    const GdkRGBA before = ScreenColor(color);
    gtk_color_chooser_set_rgba(GTK_COLOR_CHOOSER(dialog), &before);
    const bool picked = gtk_dialog_run(GTK_DIALOG(dialog)) == GTK_RESPONSE_OK;
    if (picked) {
        GdkRGBA chosen{};
        gtk_color_chooser_get_rgba(GTK_COLOR_CHOOSER(dialog), &chosen);
        color = StoredColor(chosen);
    }
    gtk_widget_destroy(dialog);
    return picked;
}

void RunMessage(GtkWindow* parent, GtkMessageType type, const std::u16string& text,
                const std::u16string& details) {
    GtkWidget* const dialog = gtk_message_dialog_new(
        parent, GTK_DIALOG_MODAL, type, GTK_BUTTONS_CLOSE, "%s", ViewText(text).c_str());
    if (!details.empty()) {
        gtk_message_dialog_format_secondary_text(GTK_MESSAGE_DIALOG(dialog), "%s",
                                                 ViewText(details).c_str());
    }
    gtk_dialog_run(GTK_DIALOG(dialog));
    gtk_widget_destroy(dialog);
}

}  // namespace zm
