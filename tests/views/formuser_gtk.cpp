#include <cstdlib>

#include "actions/uActionFormLayout.h"
#include "actions/views/gtk/uGtkTexts.h"
#include "engine/foundation/zmstrings.h"
#include "tests/views/gtkwidgets.h"

namespace zm::test {
namespace {

constexpr guint kStepMilliseconds = 10;
constexpr char16_t kMessageClass[] = u"GtkMessageDialog";

GSource* step_source = nullptr;
std::function<void()> step_function;

GtkWidget* WidgetOf(const TFormWindow& form, const char16_t* name) {
    return GTK_WIDGET(form.Control(name));
}

/// Bindings of the toolkit go by the keyboard's own number of a key.
guint16 HardwareCode(guint key) {
    GdkKeymapKey* keys = nullptr;
    gint count = 0;
    gdk_keymap_get_entries_for_keyval(gdk_keymap_get_for_display(gdk_display_get_default()), key,
                                      &keys, &count);
    const auto code = static_cast<guint16>(count > 0 ? keys[0].keycode : 0);
    g_free(keys);
    return code;
}

std::string MessageText(TWindow message) {
    char* text = nullptr;
    g_object_get(GTK_WIDGET(message), "text", &text, nullptr);
    const std::string copy = text;
    g_free(text);
    return copy;
}

void ExpectUnclipped(const TFormWindow& form, const TFormControl& control) {
    SCOPED_TRACE(ViewText(control.name));
    GtkWidget* const widget = WidgetOf(form, control.name.c_str());
    const int width = gtk_widget_get_allocated_width(widget);
    int needed_width = 0;
    int needed_height = 0;
    gtk_widget_get_preferred_width(widget, nullptr, &needed_width);
    gtk_widget_get_preferred_height_for_width(widget, width, nullptr, &needed_height);
    if (control.kind != fcEdit && control.kind != fcWrappedLabel) {
        EXPECT_GE(width, needed_width);
    }
    EXPECT_GE(gtk_widget_get_allocated_height(widget), needed_height);
    int x = 0;
    int y = 0;
    GtkWidget* const window = GTK_WIDGET(form.window);
    gtk_widget_translate_coordinates(widget, window, 0, 0, &x, &y);
    EXPECT_LE(x + width, gtk_widget_get_allocated_width(window));
    EXPECT_LE(y + needed_height, gtk_widget_get_allocated_height(window));
}

}  // namespace

bool HasDisplay() {
    return std::getenv("DISPLAY") != nullptr;
}

TWindow WindowTitled(const std::u16string& title) {
    const std::string wanted = ViewText(title);
    GtkWidget* const modal = gtk_grab_get_current();
    GtkWidget* const on_top = modal == nullptr ? nullptr : gtk_widget_get_toplevel(modal);
    GtkWidget* found = nullptr;
    GList* const windows = gtk_window_list_toplevels();
    for (GList* node = windows; node != nullptr; node = node->next) {
        GtkWidget* const window = GTK_WIDGET(node->data);
        const char* const text = gtk_window_get_title(GTK_WINDOW(window));
        const bool is_it =
            (text != nullptr && wanted == text) || wanted == G_OBJECT_TYPE_NAME(window);
        const bool takes_input =
            gtk_widget_get_mapped(window) != FALSE && (on_top == nullptr || on_top == window);
        found = is_it && takes_input ? window : found;
    }
    g_list_free(windows);
    return found;
}

void CallInLoops(std::function<void()> step) {
    if (step_source != nullptr) {
        g_source_destroy(step_source);
        g_source_unref(step_source);
        step_source = nullptr;
    }
    step_function = std::move(step);
    if (step_function) {
        step_source = g_timeout_source_new(kStepMilliseconds);
        g_source_set_can_recurse(step_source, TRUE);
        g_source_set_callback(
            step_source,
            [](gpointer) -> gboolean {
                step_function();
                return G_SOURCE_CONTINUE;
            },
            nullptr, nullptr);
        g_source_attach(step_source, nullptr);
    }
}

void PressKey(TWindow window, TKey key) {
    GtkWidget* const widget = GTK_WIDGET(window);
    GdkEvent* const event = gdk_event_new(GDK_KEY_PRESS);
    event->key.window = GDK_WINDOW(g_object_ref(gtk_widget_get_window(widget)));
    event->key.keyval = key == tkEnter ? GDK_KEY_Return : GDK_KEY_Escape;
    event->key.hardware_keycode = HardwareCode(event->key.keyval);
    gdk_event_set_device(
        event, gdk_seat_get_keyboard(gdk_display_get_default_seat(gtk_widget_get_display(widget))));
    gtk_widget_event(widget, event);
    gdk_event_free(event);
}

void PressCloseBox(TWindow window) {
    gtk_window_close(GTK_WINDOW(window));
}

TWindow TFormWindow::Control(const char16_t* name, std::int32_t item) const {
    const std::string number = item < 0 ? "" : std::to_string(item);
    GtkWidget* const found = FindWidget(GTK_WIDGET(window), ViewText(name) + number);
    EXPECT_NE(found, nullptr) << ViewText(name) << number;
    return found;
}

std::u16string TFormWindow::Text(const char16_t* name) const {
    GtkWidget* const widget = WidgetOf(*this, name);
    return ModelText(GTK_IS_ENTRY(widget) ? gtk_entry_get_text(GTK_ENTRY(widget))
                                          : gtk_label_get_text(GTK_LABEL(widget)));
}

bool TFormWindow::IsEnabled(const char16_t* name) const {
    return gtk_widget_is_sensitive(WidgetOf(*this, name)) != FALSE;
}

std::int32_t TFormWindow::Chosen(const char16_t* name) const {
    return gtk_combo_box_get_active(GTK_COMBO_BOX(Control(name)));
}

bool TFormWindow::HasFocus(const char16_t* name) const {
    return gtk_window_get_focus(GTK_WINDOW(window)) == Control(name);
}

void TFormWindow::Focus(const char16_t* name) const {
    gtk_widget_grab_focus(WidgetOf(*this, name));
}

std::int32_t TFormWindow::Caret(const char16_t* edit) const {
    return UnitsBefore(Text(edit), gtk_editable_get_position(GTK_EDITABLE(Control(edit))));
}

void TFormWindow::PutCaret(const char16_t* edit, std::int32_t place) const {
    gtk_editable_set_position(GTK_EDITABLE(Control(edit)), CharactersBefore(Text(edit), place));
}

void TFormWindow::Type(const char16_t* edit, const std::u16string& text) const {
    gtk_entry_set_text(GTK_ENTRY(Control(edit)), ViewText(text).c_str());
}

void TFormWindow::Choose(const char16_t* name, std::int32_t item) const {
    if (Declared(name).kind == fcRadioGroup) {
        gtk_toggle_button_set_active(GTK_TOGGLE_BUTTON(Control(name, item)), TRUE);
    } else {
        gtk_combo_box_set_active(GTK_COMBO_BOX(Control(name)), item);
    }
}

void TFormWindow::Press(const char16_t* name) const {
    gtk_button_clicked(GTK_BUTTON(Control(name)));
}

void TUser::CloseMessage(const std::u16string&, const std::u16string& text) {
    In(kMessageClass, [text](TWindow message) {
        EXPECT_TRUE(MessageText(message).starts_with(ViewText(text))) << MessageText(message);
        gtk_dialog_response(GTK_DIALOG(message), GTK_RESPONSE_CLOSE);
    });
}

void TUser::Answer(const std::u16string&, TAnswer answer) {
    In(kMessageClass, [answer](TWindow question) {
        constexpr int kResponses[] = {1, 2, GTK_RESPONSE_CANCEL};
        GtkDialog* const dialog = GTK_DIALOG(question);
        gtk_button_clicked(
            GTK_BUTTON(gtk_dialog_get_widget_for_response(dialog, kResponses[answer])));
    });
}

/// A font or theme may need more than the scale gives.
void ExpectFits(const TFormWindow& form, std::int32_t percent) {
    EXPECT_GE(gtk_widget_get_allocated_width(GTK_WIDGET(form.window)),
              ScaleLength(form.design.client_width, percent));
    for (const TFormControl& control : form.design.controls) {
        ExpectUnclipped(form, control);
    }
}

bool HasKeyboard(TWindow window) {
    const bool has_it = gtk_window_has_toplevel_focus(GTK_WINDOW(window)) != FALSE;
    if (!has_it) {
        gdk_window_focus(gtk_widget_get_window(GTK_WIDGET(window)), GDK_CURRENT_TIME);
    }
    return has_it;
}

std::vector<std::u16string> FocusRound(const TFormWindow& form) {
    GtkWidget* const window = GTK_WIDGET(form.window);
    std::vector<std::u16string> names;
    gtk_window_set_focus(GTK_WINDOW(window), nullptr);
    while (names.size() < 50 && gtk_widget_child_focus(window, GTK_DIR_TAB_FORWARD) != FALSE) {
        GtkWidget* named = gtk_window_get_focus(GTK_WINDOW(window));
        // A drop-down list's inner button takes the focus for it.
        while (g_str_has_prefix(gtk_widget_get_name(named), "Gtk")) {
            named = gtk_widget_get_parent(named);
        }
        const std::u16string name = ModelText(gtk_widget_get_name(named));
        if (!names.empty() && name == names.front()) {
            break;
        }
        names.push_back(name);
    }
    return names;
}

void UseDialogFont(const std::string& font) {
    g_object_set(gtk_settings_get_default(), "gtk-font-name", font.c_str(), nullptr);
}

bool SavePicture(TWindow window, const std::u16string& file_name) {
    GtkWidget* const widget = GTK_WIDGET(window);
    GdkPixbuf* picture = gdk_pixbuf_get_from_window(gtk_widget_get_window(widget), 0, 0,
                                                    gtk_widget_get_allocated_width(widget),
                                                    gtk_widget_get_allocated_height(widget));
    const bool saved =
        picture != nullptr && gdk_pixbuf_save(picture, Utf8FromUtf16(file_name).c_str(), "png",
                                              nullptr, nullptr) != FALSE;
    g_clear_object(&picture);
    return saved;
}

}  // namespace zm::test
