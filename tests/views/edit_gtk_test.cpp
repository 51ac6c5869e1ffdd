// The job editor's window of this toolkit, and what is told without it.
#include "tests/views/edituser.h"
#include "tests/views/gtkwidgets.h"

namespace zm::test {
namespace {

GtkWidget* Part(TWindow window, const char* name) {
    GtkWidget* const found = FindWidget(GTK_WIDGET(window), name);
    EXPECT_NE(found, nullptr) << name;
    return found;
}

GtkWidget* Button(TWindow editor, TEditorButton button) {
    constexpr const char* kNames[] = {"Configure", "Remove", "Up", "Down", "Save", "Close"};
    return Part(editor, kNames[button]);
}

void ChooseRow(GtkWidget* list, int row) {
    GtkTreePath* const path = gtk_tree_path_new_from_indices(row, -1);
    gtk_tree_view_set_cursor(GTK_TREE_VIEW(list), path, nullptr, FALSE);
    gtk_tree_path_free(path);
}

/// A plug-in that was copied alone still runs jobs, and tells what it misses.
TEST(QvEdit, WithoutTheDialogsTheLogTellsWhy) {
    const TempFolder folder;
    std::filesystem::copy_file(ZM_MODULE_DIR "/Graphics.qvp", folder.File("Graphics.qvp"));
    qvrun::THost host;
    std::string error_text;
    ASSERT_TRUE(host.Load(folder.Name("Graphics.qvp"), error_text)) << error_text;
    qvrun::TJobEditor editor(host, folder.Name("a.qvjob"), nullptr);
    EXPECT_FALSE(editor.AddStep(0, 0));
    EXPECT_FALSE(editor.IsChanged());
    const std::vector<std::u16string> log = editor.TakeLog();
    ASSERT_EQ(log.size(), 1u);
    EXPECT_TRUE(
        log[0].starts_with(u"The settings dialog cannot be shown: the module with the "
                           u"dialogs cannot be loaded: "));
}

/// The program tells why no window opens, before anything is changed.
TEST(QvEdit, WithoutADisplayItSaysSo) {
    const TempFolder folder;
    const TProcessResult result =
        RunProcess("env -u DISPLAY -u WAYLAND_DISPLAY " ZM_MODULE_DIR "/qvrun edit " +
                       folder.File("new.qvjob").string(),
                   folder.Path());
    EXPECT_EQ(result.exit_status, 2);
    EXPECT_NE(result.standard_error.find("cannot open the job editor: "), std::string::npos)
        << result.standard_error;
    EXPECT_FALSE(std::filesystem::exists(folder.File("new.qvjob")));
}

}  // namespace

bool IsEnabled(TWindow editor, TEditorButton button) {
    return gtk_widget_is_sensitive(Button(editor, button)) != FALSE;
}

void PressButton(TWindow editor, TEditorButton button) {
    gtk_button_clicked(GTK_BUTTON(Button(editor, button)));
}

/// Menu entries are windows of their own; the entry is pressed without opening the menu.
void PressAdd(TWindow editor, int action) {
    GtkMenu* const menu = gtk_menu_button_get_popup(GTK_MENU_BUTTON(Part(editor, "Add")));
    const std::string entry = "Add" + std::to_string(action);
    gtk_menu_item_activate(GTK_MENU_ITEM(FindWidget(GTK_WIDGET(menu), entry)));
}

int ChosenStep(TWindow editor) {
    GtkTreePath* path = nullptr;
    gtk_tree_view_get_cursor(GTK_TREE_VIEW(Part(editor, "Steps")), &path, nullptr);
    const int chosen = path == nullptr ? -1 : gtk_tree_path_get_indices(path)[0];
    gtk_tree_path_free(path);
    return chosen;
}

void ChooseStep(TWindow editor, int step) {
    ChooseRow(Part(editor, "Steps"), step);
}

void PickVariable(TUser& user, int row) {
    user.In(kVariables, [row](TWindow list) { ChooseRow(Part(list, "Variables"), row); });
    Respond(user, kVariables, GTK_RESPONSE_OK);
}

}  // namespace zm::test
