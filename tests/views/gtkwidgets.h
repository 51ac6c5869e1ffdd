#pragma once

#include <gtk/gtk.h>

#include <string>
#include <utility>

#include "tests/views/formuser.h"

namespace zm::test {

/// The widget of this name in a window, or nil.
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

inline void Respond(TUser& user, const std::u16string& title, int response) {
    user.In(title,
            [response](TWindow dialog) { gtk_dialog_response(GTK_DIALOG(dialog), response); });
}

}  // namespace zm::test
