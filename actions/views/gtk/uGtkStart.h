#pragma once

#include <gtk/gtk.h>

namespace zm {

/// Starts GTK on the user's display; False when there is none. A program that uses GTK itself
/// has started it already. The locale stays the program's: its numbers must not change because
/// a window was shown.
inline bool StartGtk() {
    if (gdk_display_get_default() != nullptr) {
        return true;
    }
    static const bool keeps_locale = (gtk_disable_setlocale(), true);
    return keeps_locale && gtk_init_check(nullptr, nullptr) != FALSE;
}

}  // namespace zm
