#pragma once

#include <gtest/gtest.h>
#include <gtk/gtk.h>

#include <cstdio>
#include <cstdlib>
#include <deque>
#include <functional>
#include <string>
#include <utility>

/// A user of real windows: does one act after the other, each in the window that it waits for.
namespace zm::test {

inline GtkWidget* FindWidget(GtkWidget* root, const std::string& name) {
    if (name == gtk_widget_get_name(root)) {
        return root;
    }
    std::pair<const std::string*, GtkWidget*> search{&name, nullptr};
    if (GTK_IS_CONTAINER(root)) {
        gtk_container_forall(
            GTK_CONTAINER(root),
            [](GtkWidget* child, gpointer data) {
                auto& [wanted, found] = *static_cast<decltype(search)*>(data);
                found = found == nullptr ? FindWidget(child, *wanted) : found;
            },
            &search);
    }
    return search.second;
}

/// The shown window of this name; a window of the toolkit's own goes by its class.
inline GtkWidget* FindWindow(const std::string& name) {
    GList* const windows = gtk_window_list_toplevels();
    GtkWidget* found = nullptr;
    for (GList* node = windows; node != nullptr; node = node->next) {
        GtkWidget* const window = GTK_WIDGET(node->data);
        const bool is_it =
            name == gtk_widget_get_name(window) || name == G_OBJECT_TYPE_NAME(window);
        found = is_it && gtk_widget_get_mapped(window) != FALSE ? window : found;
    }
    g_list_free(windows);
    return found;
}

inline GtkWidget* Widget(const std::string& window, const std::string& name) {
    GtkWidget* const root = FindWindow(window);
    GtkWidget* const found = root == nullptr ? nullptr : FindWidget(root, name);
    EXPECT_NE(found, nullptr) << window << " has no " << name;
    return found;
}

/// Bindings of the toolkit go by the keyboard's own number of a key.
inline guint16 HardwareCode(guint key) {
    GdkKeymapKey* keys = nullptr;
    gint count = 0;
    gdk_keymap_get_entries_for_keyval(gdk_keymap_get_for_display(gdk_display_get_default()), key,
                                      &keys, &count);
    const auto code = static_cast<guint16>(count > 0 ? keys[0].keycode : 0);
    g_free(keys);
    return code;
}

class TGtkUser {
public:
    /// True when the act is done, False to be asked again.
    using TAct = std::function<bool(GtkWidget* window)>;

    TGtkUser() : source_(g_timeout_source_new(5)) {
        g_source_set_callback(source_, &Step, this, nullptr);
        g_source_set_can_recurse(source_, TRUE);
        g_source_attach(source_, nullptr);
    }
    ~TGtkUser() {
        g_source_destroy(source_);
        g_source_unref(source_);
        EXPECT_TRUE(acts_.empty()) << "window " << acts_.front().first << " never came";
    }
    TGtkUser(const TGtkUser&) = delete;
    TGtkUser& operator=(const TGtkUser&) = delete;

    void WhenReady(const std::string& window, TAct act) {
        acts_.emplace_back(window, std::move(act));
    }
    void In(const std::string& window, std::function<void()> act) {
        WhenReady(window, [act = std::move(act)](GtkWidget*) {
            act();
            return true;
        });
    }
    void Press(const std::string& window, const std::string& button) {
        In(window, [=] { gtk_button_clicked(GTK_BUTTON(Widget(window, button))); });
    }
    void Respond(const std::string& window, int response) {
        WhenReady(window, [response](GtkWidget* dialog) {
            gtk_dialog_response(GTK_DIALOG(dialog), response);
            return true;
        });
    }
    void PressKey(const std::string& window, guint key) {
        WhenReady(window, [key](GtkWidget* widget) {
            GdkEvent* const event = gdk_event_new(GDK_KEY_PRESS);
            event->key.window = GDK_WINDOW(g_object_ref(gtk_widget_get_window(widget)));
            event->key.keyval = key;
            event->key.hardware_keycode = HardwareCode(key);
            gdk_event_set_device(event, gdk_seat_get_keyboard(gdk_display_get_default_seat(
                                            gtk_widget_get_display(widget))));
            gtk_widget_event(widget, event);
            gdk_event_free(event);
            return true;
        });
    }

private:
    /// An act may open a dialog and with it another main loop, in which the next acts come. A
    /// dialog that nobody answers would wait for ever: the program ends instead.
    static gboolean Step(gpointer data) {
        auto& user = *static_cast<TGtkUser*>(data);
        GtkWidget* const window =
            user.acts_.empty() ? nullptr : FindWindow(user.acts_.front().first);
        if (user.acts_.size() != user.waiting_) {
            user.waiting_ = user.acts_.size();
            user.since_ = g_get_monotonic_time();
        } else if (user.waiting_ != 0 && g_get_monotonic_time() - user.since_ > kLimit) {
            std::fprintf(stderr, "Nobody answers: the act in %s, %zu before the end, is not done\n",
                         user.acts_.front().first.c_str(), user.waiting_);
            std::_Exit(EXIT_FAILURE);
        }
        if (window != nullptr) {
            auto act = std::move(user.acts_.front());
            user.acts_.pop_front();
            if (!act.second(window)) {
                user.acts_.push_front(std::move(act));
            }
        }
        return G_SOURCE_CONTINUE;
    }

    static constexpr gint64 kLimit = 60'000'000;  ///< microseconds for one act

    GSource* source_;
    std::deque<std::pair<std::string, TAct>> acts_;
    std::size_t waiting_ = 0;
    gint64 since_ = 0;
};

}  // namespace zm::test
