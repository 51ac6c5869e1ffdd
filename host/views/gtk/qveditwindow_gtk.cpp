#include <gtk/gtk.h>

#include <algorithm>

#include "actions/views/gtk/uGtkStart.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/callconv.h"
#include "host/qveditwindow.h"

/// The job editor's window: the list of steps with its buttons.
namespace zm::qvrun {
namespace {

constexpr int kMargin = 12;
constexpr int kGap = 6;
constexpr int kWindowWidth = 740;
constexpr int kWindowHeight = 400;
constexpr int kPickerWidth = 460;
constexpr int kPickerHeight = 320;

enum TStepColumn : std::uint8_t { scNumber, scAction, scDescription, scCount };
enum TVariableColumn : std::uint8_t { vcReference, vcMeaning, vcCount };
enum TCloseAnswer : int { caSave = 1, caDiscard = 2 };

constexpr char kActionKey[] = "zalmo-action";
constexpr char kPlaceholder[] =
    "No steps yet.\n\nPress Add. A job opens an image, changes it, and saves it:\n"
    "begin with Open Image and end with Save Image.\nIn the dialogs, {V} offers the names of "
    "the files that the job will run for.";

/// UTF-8 that the toolkit accepts; this window shows texts and never takes any.
std::string Shown(std::u16string_view text) {
    const std::string bytes = Utf8FromUtf16(text);
    char* const valid = g_utf8_make_valid(bytes.data(), static_cast<gssize>(bytes.size()));
    std::string shown = valid;
    g_free(valid);
    return shown;
}

void AddTextColumn(GtkWidget* list, const char* title, int column, gboolean expands) {
    GtkCellRenderer* const cell = gtk_cell_renderer_text_new();
    g_object_set(cell, "ellipsize", expands ? PANGO_ELLIPSIZE_END : PANGO_ELLIPSIZE_NONE, nullptr);
    GtkTreeViewColumn* const made =
        gtk_tree_view_column_new_with_attributes(title, cell, "text", column, nullptr);
    gtk_tree_view_column_set_expand(made, expands);
    gtk_tree_view_append_column(GTK_TREE_VIEW(list), made);
}

/// The chosen row of a list, -1 for none.
int ChosenRow(GtkWidget* list) {
    GtkTreeModel* model = nullptr;
    GtkTreeIter row{};
    GtkTreeSelection* const selection = gtk_tree_view_get_selection(GTK_TREE_VIEW(list));
    if (gtk_tree_selection_get_selected(selection, &model, &row) == FALSE) {
        return -1;
    }
    GtkTreePath* const path = gtk_tree_model_get_path(model, &row);
    const int index = gtk_tree_path_get_indices(path)[0];
    gtk_tree_path_free(path);
    return index;
}

void ChooseRow(GtkWidget* list, int index) {
    if (index < 0) {
        return;
    }
    GtkTreePath* const path = gtk_tree_path_new_from_indices(index, -1);
    gtk_tree_view_set_cursor(GTK_TREE_VIEW(list), path, nullptr, FALSE);
    gtk_tree_path_free(path);
}

GtkWidget* NewScrolled(GtkWidget* list) {
    GtkWidget* const scrolled = gtk_scrolled_window_new(nullptr, nullptr);
    gtk_scrolled_window_set_shadow_type(GTK_SCROLLED_WINDOW(scrolled), GTK_SHADOW_IN);
    gtk_scrolled_window_set_policy(GTK_SCROLLED_WINDOW(scrolled), GTK_POLICY_NEVER,
                                   GTK_POLICY_AUTOMATIC);
    gtk_container_add(GTK_CONTAINER(scrolled), list);
    return scrolled;
}

void Tell(GtkWindow* parent, GtkMessageType type, const std::string& text) {
    GtkWidget* const dialog = gtk_message_dialog_new(parent, GTK_DIALOG_MODAL, type,
                                                     GTK_BUTTONS_CLOSE, "%s", text.c_str());
    gtk_dialog_run(GTK_DIALOG(dialog));
    gtk_widget_destroy(dialog);
}

/// One job's window while it is open.
class TEditView {
public:
    explicit TEditView(IJobEditor& editor);
    ~TEditView();
    TEditView(const TEditView&) = delete;
    TEditView& operator=(const TEditView&) = delete;
    void Run();

private:
    GtkWidget* NewStepList();
    GtkWidget* NewButtonColumn();
    GtkWidget* NewBottomRow();
    GtkWidget* NewAddButton();
    GtkWidget* NewButton(const char* name, const char* caption, GCallback handler);
    void Refresh(int chosen);
    void RefreshButtons();
    void Add(std::size_t action);
    void Configure();
    void MoveBy(int distance);
    void Remove();
    bool Save();
    /// Whether the window may close; asks when there is something to lose.
    bool MayClose();
    void Close();
    void ShowLog();

    static TEditView& Of(gpointer user) { return *static_cast<TEditView*>(user); }
    static void OnAdd(GtkWidget* item, gpointer user) {
        gpointer action = g_object_get_data(G_OBJECT(item), kActionKey);
        Of(user).Add(static_cast<std::size_t>(GPOINTER_TO_INT(action)));
    }
    static void OnConfigure(GtkWidget*, gpointer user) { Of(user).Configure(); }
    static void OnRemove(GtkWidget*, gpointer user) { Of(user).Remove(); }
    static void OnUp(GtkWidget*, gpointer user) { Of(user).MoveBy(-1); }
    static void OnDown(GtkWidget*, gpointer user) { Of(user).MoveBy(1); }
    static void OnSave(GtkWidget*, gpointer user) { Of(user).Save(); }
    static void OnClose(GtkWidget*, gpointer user) { Of(user).Close(); }
    static void OnChosen(GtkTreeSelection*, gpointer user) { Of(user).RefreshButtons(); }
    static void OnActivated(GtkTreeView*, GtkTreePath*, GtkTreeViewColumn*, gpointer user) {
        Of(user).Configure();
    }
    static gboolean OnListKey(GtkWidget* list, GdkEventKey* event, gpointer user);
    static gboolean OnDelete(GtkWidget* window, GdkEvent* event, gpointer user);

    IJobEditor& editor_;
    GtkWidget* window_;
    GtkListStore* rows_;
    GtkWidget* list_ = nullptr;
    GtkWidget* placeholder_ = nullptr;
    GtkWidget* configure_ = nullptr;
    GtkWidget* remove_ = nullptr;
    GtkWidget* up_ = nullptr;
    GtkWidget* down_ = nullptr;
    GtkWidget* save_ = nullptr;
    GMainLoop* loop_;
};

TEditView::TEditView(IJobEditor& editor)
    : editor_(editor),
      window_(gtk_window_new(GTK_WINDOW_TOPLEVEL)),
      rows_(gtk_list_store_new(scCount, G_TYPE_STRING, G_TYPE_STRING, G_TYPE_STRING)),
      loop_(g_main_loop_new(nullptr, FALSE)) {
    gtk_widget_set_name(window_, "JobEditor");
    gtk_window_set_default_size(GTK_WINDOW(window_), kWindowWidth, kWindowHeight);
    gtk_window_set_position(GTK_WINDOW(window_), GTK_WIN_POS_CENTER);
    gtk_container_set_border_width(GTK_CONTAINER(window_), kMargin);
    GtkWidget* const grid = gtk_grid_new();
    gtk_grid_set_row_spacing(GTK_GRID(grid), kMargin);
    gtk_grid_set_column_spacing(GTK_GRID(grid), kMargin);
    gtk_grid_attach(GTK_GRID(grid), NewStepList(), 0, 0, 1, 1);
    gtk_grid_attach(GTK_GRID(grid), NewButtonColumn(), 1, 0, 1, 1);
    gtk_grid_attach(GTK_GRID(grid), NewBottomRow(), 0, 1, 2, 1);
    gtk_container_add(GTK_CONTAINER(window_), grid);
    g_signal_connect(window_, "delete-event", G_CALLBACK(&OnDelete), this);
    gtk_widget_show_all(window_);
    Refresh(0);
}

TEditView::~TEditView() {
    gtk_widget_destroy(window_);
    g_object_unref(rows_);
    g_main_loop_unref(loop_);
}

void TEditView::Run() {
    gtk_window_present(GTK_WINDOW(window_));
    g_main_loop_run(loop_);
}

GtkWidget* TEditView::NewStepList() {
    list_ = gtk_tree_view_new_with_model(GTK_TREE_MODEL(rows_));
    gtk_widget_set_name(list_, "Steps");
    gtk_tree_view_set_enable_search(GTK_TREE_VIEW(list_), FALSE);
    AddTextColumn(list_, "", scNumber, FALSE);
    AddTextColumn(list_, "Step", scAction, FALSE);
    AddTextColumn(list_, "What it does", scDescription, TRUE);
    g_signal_connect(list_, "row-activated", G_CALLBACK(&OnActivated), this);
    g_signal_connect(list_, "key-press-event", G_CALLBACK(&OnListKey), this);
    g_signal_connect(gtk_tree_view_get_selection(GTK_TREE_VIEW(list_)), "changed",
                     G_CALLBACK(&OnChosen), this);
    GtkWidget* const overlay = gtk_overlay_new();
    gtk_container_add(GTK_CONTAINER(overlay), NewScrolled(list_));
    placeholder_ = gtk_label_new(kPlaceholder);
    gtk_label_set_justify(GTK_LABEL(placeholder_), GTK_JUSTIFY_CENTER);
    gtk_widget_set_halign(placeholder_, GTK_ALIGN_CENTER);
    gtk_widget_set_valign(placeholder_, GTK_ALIGN_CENTER);
    gtk_overlay_add_overlay(GTK_OVERLAY(overlay), placeholder_);
    gtk_overlay_set_overlay_pass_through(GTK_OVERLAY(overlay), placeholder_, TRUE);
    gtk_widget_set_hexpand(overlay, TRUE);
    gtk_widget_set_vexpand(overlay, TRUE);
    return overlay;
}

GtkWidget* TEditView::NewButton(const char* name, const char* caption, GCallback handler) {
    GtkWidget* const button = gtk_button_new_with_mnemonic(caption);
    gtk_widget_set_name(button, name);
    g_signal_connect(button, "clicked", handler, this);
    return button;
}

/// A menu with one entry per action.
GtkWidget* TEditView::NewAddButton() {
    GtkWidget* const menu = gtk_menu_new();
    int index = 0;
    for (const std::u16string& action : editor_.ActionNames()) {
        GtkWidget* const item = gtk_menu_item_new_with_label(Shown(action).c_str());
        gtk_widget_set_name(item, ("Add" + std::to_string(index)).c_str());
        g_object_set_data(G_OBJECT(item), kActionKey, GINT_TO_POINTER(index++));
        g_signal_connect(item, "activate", G_CALLBACK(&OnAdd), this);
        gtk_menu_shell_append(GTK_MENU_SHELL(menu), item);
    }
    gtk_widget_show_all(menu);
    GtkWidget* const button = gtk_menu_button_new();
    gtk_widget_set_name(button, "Add");
    gtk_menu_button_set_popup(GTK_MENU_BUTTON(button), menu);
    GtkWidget* const row = gtk_box_new(GTK_ORIENTATION_HORIZONTAL, kGap);
    GtkWidget* const label = gtk_label_new_with_mnemonic("_Add");
    gtk_label_set_mnemonic_widget(GTK_LABEL(label), button);
    gtk_box_set_center_widget(GTK_BOX(row), label);
    gtk_box_pack_end(GTK_BOX(row),
                     gtk_image_new_from_icon_name("pan-down-symbolic", GTK_ICON_SIZE_BUTTON), FALSE,
                     FALSE, 0);
    gtk_container_add(GTK_CONTAINER(button), row);
    return button;
}

GtkWidget* TEditView::NewButtonColumn() {
    configure_ = NewButton("Configure", "_Configure...", G_CALLBACK(&OnConfigure));
    remove_ = NewButton("Remove", "_Remove", G_CALLBACK(&OnRemove));
    up_ = NewButton("Up", "Move _Up", G_CALLBACK(&OnUp));
    down_ = NewButton("Down", "Move _Down", G_CALLBACK(&OnDown));
    GtkWidget* const column = gtk_box_new(GTK_ORIENTATION_VERTICAL, kGap);
    for (GtkWidget* button : {NewAddButton(), configure_, remove_, up_, down_}) {
        gtk_box_pack_start(GTK_BOX(column), button, FALSE, FALSE, 0);
    }
    return column;
}

GtkWidget* TEditView::NewBottomRow() {
    const std::string command =
        "Run it with:  qvrun run " + Shown(editor_.FileName()) + " PICTURES... --output FOLDER";
    GtkWidget* const hint = gtk_label_new(command.c_str());
    gtk_label_set_selectable(GTK_LABEL(hint), TRUE);
    gtk_label_set_line_wrap(GTK_LABEL(hint), TRUE);
    gtk_label_set_line_wrap_mode(GTK_LABEL(hint), PANGO_WRAP_WORD_CHAR);
    gtk_label_set_xalign(GTK_LABEL(hint), 0.0F);
    gtk_widget_set_can_focus(hint, FALSE);
    save_ = NewButton("Save", "_Save", G_CALLBACK(&OnSave));
    GtkWidget* const close = NewButton("Close", "C_lose", G_CALLBACK(&OnClose));
    GtkWidget* const row = gtk_box_new(GTK_ORIENTATION_HORIZONTAL, kGap);
    gtk_box_pack_start(GTK_BOX(row), hint, TRUE, TRUE, 0);
    gtk_box_pack_end(GTK_BOX(row), close, FALSE, FALSE, 0);
    gtk_box_pack_end(GTK_BOX(row), save_, FALSE, FALSE, 0);
    return row;
}

/// Shows the job as it is now.
void TEditView::Refresh(int chosen) {
    gtk_list_store_clear(rows_);
    const std::vector<TStepLine> steps = editor_.Steps();
    for (std::size_t index = 0; index < steps.size(); ++index) {
        gtk_list_store_insert_with_values(rows_, nullptr, -1, scNumber,
                                          std::to_string(index + 1).c_str(), scAction,
                                          Shown(steps[index].action).c_str(), scDescription,
                                          Shown(steps[index].description).c_str(), -1);
    }
    gtk_widget_set_visible(placeholder_, steps.empty() ? TRUE : FALSE);
    ChooseRow(list_, std::min(chosen, static_cast<int>(steps.size()) - 1));
    const std::string title =
        (editor_.IsChanged() ? "*" : "") + Shown(FileBaseName(editor_.FileName())) + " - Job";
    gtk_window_set_title(GTK_WINDOW(window_), title.c_str());
    RefreshButtons();
}

void TEditView::RefreshButtons() {
    const int chosen = ChosenRow(list_);
    const int count = gtk_tree_model_iter_n_children(GTK_TREE_MODEL(rows_), nullptr);
    gtk_widget_set_sensitive(configure_, chosen >= 0 ? TRUE : FALSE);
    gtk_widget_set_sensitive(remove_, chosen >= 0 ? TRUE : FALSE);
    gtk_widget_set_sensitive(up_, chosen > 0 ? TRUE : FALSE);
    gtk_widget_set_sensitive(down_, chosen >= 0 && chosen + 1 < count ? TRUE : FALSE);
    gtk_widget_set_sensitive(save_, editor_.IsChanged() ? TRUE : FALSE);
}

/// Steps are added below the chosen one.
void TEditView::Add(std::size_t action) {
    const int position = ChosenRow(list_) + 1;
    if (editor_.AddStep(action, static_cast<std::size_t>(position))) {
        Refresh(position);
    }
    ShowLog();
}

void TEditView::Configure() {
    const int chosen = ChosenRow(list_);
    if (chosen >= 0 && editor_.ConfigureStep(static_cast<std::size_t>(chosen))) {
        Refresh(chosen);
    }
    ShowLog();
}

void TEditView::MoveBy(int distance) {
    const int chosen = ChosenRow(list_);
    const int target = chosen + distance;
    if (chosen >= 0 && target >= 0) {
        editor_.MoveStep(static_cast<std::size_t>(chosen), static_cast<std::size_t>(target));
        Refresh(target);
    }
}

void TEditView::Remove() {
    const int chosen = ChosenRow(list_);
    if (chosen >= 0) {
        editor_.RemoveStep(static_cast<std::size_t>(chosen));
        Refresh(chosen);
    }
}

bool TEditView::Save() {
    std::u16string reason;
    const bool saved = editor_.Save(reason);
    if (!saved) {
        Tell(GTK_WINDOW(window_), GTK_MESSAGE_ERROR, "The job cannot be saved: " + Shown(reason));
    }
    Refresh(ChosenRow(list_));
    return saved;
}

bool TEditView::MayClose() {
    if (!editor_.IsChanged()) {
        return true;
    }
    GtkWidget* const dialog =
        gtk_message_dialog_new(GTK_WINDOW(window_), GTK_DIALOG_MODAL, GTK_MESSAGE_QUESTION,
                               GTK_BUTTONS_NONE, "Save the changes of the job?");
    gtk_dialog_add_buttons(GTK_DIALOG(dialog), "_Discard", caDiscard, "_Cancel",
                           GTK_RESPONSE_CANCEL, "_Save", caSave, nullptr);
    gtk_dialog_set_default_response(GTK_DIALOG(dialog), caSave);
    const int answer = gtk_dialog_run(GTK_DIALOG(dialog));
    gtk_widget_destroy(dialog);
    return answer == caDiscard || (answer == caSave && Save());
}

void TEditView::Close() {
    if (MayClose()) {
        g_main_loop_quit(loop_);
    }
}

void TEditView::ShowLog() {
    std::string text;
    for (const std::u16string& line : editor_.TakeLog()) {
        text += (text.empty() ? "" : "\n") + Shown(line);
    }
    if (!text.empty()) {
        Tell(GTK_WINDOW(window_), GTK_MESSAGE_WARNING, text);
    }
}

gboolean TEditView::OnListKey(GtkWidget*, GdkEventKey* event, gpointer user) {
    if (event->keyval != GDK_KEY_Delete) {
        return GDK_EVENT_PROPAGATE;
    }
    Of(user).Remove();
    return GDK_EVENT_STOP;
}

gboolean TEditView::OnDelete(GtkWidget*, GdkEvent*, gpointer user) {
    Of(user).Close();
    return GDK_EVENT_STOP;
}

/// The program's window that the user is in: a step's dialog, when one is open.
GtkWindow* ActiveWindow() {
    GtkWidget* const modal = gtk_grab_get_current();
    return modal != nullptr && GTK_IS_WINDOW(gtk_widget_get_toplevel(modal))
               ? GTK_WINDOW(gtk_widget_get_toplevel(modal))
               : nullptr;
}

GtkWidget* NewVariableList(const std::vector<TVariableInfo>& variables) {
    GtkListStore* const rows = gtk_list_store_new(vcCount, G_TYPE_STRING, G_TYPE_STRING);
    for (const TVariableInfo& variable : variables) {
        gtk_list_store_insert_with_values(rows, nullptr, -1, vcReference,
                                          Shown(variable.reference).c_str(), vcMeaning,
                                          Shown(variable.meaning).c_str(), -1);
    }
    GtkWidget* const list = gtk_tree_view_new_with_model(GTK_TREE_MODEL(rows));
    g_object_unref(rows);
    gtk_widget_set_name(list, "Variables");
    AddTextColumn(list, "Variable", vcReference, FALSE);
    AddTextColumn(list, "Stands for", vcMeaning, TRUE);
    return list;
}

void AcceptDialog(GtkTreeView*, GtkTreePath*, GtkTreeViewColumn*, gpointer dialog) {
    gtk_dialog_response(GTK_DIALOG(dialog), GTK_RESPONSE_OK);
}

class TGtkJobEditorWindow : public IJobEditorWindow {
public:
    void Run(IJobEditor& editor) override { TEditView(editor).Run(); }
    std::u16string PickVariable(const std::vector<TVariableInfo>& variables) override;
};

std::u16string TGtkJobEditorWindow::PickVariable(const std::vector<TVariableInfo>& variables) {
    GtkWidget* const dialog =
        gtk_dialog_new_with_buttons("Insert Variable", ActiveWindow(), GTK_DIALOG_MODAL, "_Cancel",
                                    GTK_RESPONSE_CANCEL, "_Insert", GTK_RESPONSE_OK, nullptr);
    gtk_widget_set_name(dialog, "VariablePicker");
    gtk_window_set_default_size(GTK_WINDOW(dialog), kPickerWidth, kPickerHeight);
    gtk_dialog_set_default_response(GTK_DIALOG(dialog), GTK_RESPONSE_OK);
    GtkWidget* const list = NewVariableList(variables);
    g_signal_connect(list, "row-activated", G_CALLBACK(&AcceptDialog), dialog);
    GtkWidget* const content = gtk_dialog_get_content_area(GTK_DIALOG(dialog));
    gtk_container_set_border_width(GTK_CONTAINER(content), kMargin);
    gtk_box_set_spacing(GTK_BOX(content), kMargin);
    gtk_box_pack_start(GTK_BOX(content), NewScrolled(list), TRUE, TRUE, 0);
    gtk_widget_show_all(content);
    ChooseRow(list, 0);
    const bool accepted = gtk_dialog_run(GTK_DIALOG(dialog)) == GTK_RESPONSE_OK;
    const int chosen = accepted ? ChosenRow(list) : -1;
    gtk_widget_destroy(dialog);
    return chosen < 0 ? std::u16string() : variables[static_cast<std::size_t>(chosen)].reference;
}

}  // namespace
}  // namespace zm::qvrun

ZM_EXPORT zm::qvrun::IJobEditorWindow* ZmJobEditorWindow(std::u16string& reason) {
    static zm::qvrun::TGtkJobEditorWindow window;
    if (!zm::StartGtk()) {
        reason = u"there is no display to show it on";
        return nullptr;
    }
    return &window;
}
