// The job editor as a new user meets it: from no file at all to a job with a caption.
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfiletypes.h"
#include "host/qvedit.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"
#include "tests/support/testprocess.h"
#include "tests/views/gtksupport.h"

namespace zm::test {
namespace {

constexpr char kEditor[] = "JobEditor";
constexpr char kOpen[] = "TfrmOpenImageAction";
constexpr char kText[] = "TfrmTextOnImageAction";
constexpr char kSave[] = "TfrmSaveImageAction";

qvrun::THost& Host() {
    static qvrun::THost* const host = [] {
        auto* loaded = new qvrun::THost;
        std::string error_text;
        EXPECT_TRUE(loaded->Load(Utf16FromUtf8(ZM_MODULE_DIR "/Graphics.qvp"), error_text))
            << error_text;
        return loaded;
    }();
    return *host;
}

/// Menu entries are windows of their own; the entry is pressed without opening the menu.
void Add(TGtkUser& user, const std::string& entry) {
    user.In(kEditor, [entry] {
        GtkWidget* const button = Widget(kEditor, "Add");
        GtkMenu* const menu = gtk_menu_button_get_popup(GTK_MENU_BUTTON(button));
        gtk_menu_item_activate(GTK_MENU_ITEM(FindWidget(GTK_WIDGET(menu), entry)));
    });
}

void PickVariable(TGtkUser& user, const std::string& window, const std::string& edit, int row) {
    user.In(window, [=] { gtk_widget_grab_focus(Widget(window, edit)); });
    user.Press(window, "SpeedButton1");
    user.In("VariablePicker", [row] {
        GtkTreePath* const path = gtk_tree_path_new_from_indices(row, -1);
        gtk_tree_view_set_cursor(GTK_TREE_VIEW(Widget("VariablePicker", "Variables")), path,
                                 nullptr, FALSE);
        gtk_tree_path_free(path);
    });
    user.Respond("VariablePicker", GTK_RESPONSE_OK);
}

class GtkEdit : public testing::Test {
protected:
    void Edit(const std::optional<std::string>& text) {
        std::u16string reason;
        qvrun::IJobEditorWindow* const window =
            qvrun::FindEditWindow(Utf16FromUtf8(ZM_MODULE_DIR "/"), reason);
        ASSERT_NE(window, nullptr) << Utf8FromUtf16(reason);
        qvrun::TJobEditor editor(Host(), folder.Name("made.qvjob"), window);
        qvrun::TJobFileError error;
        ASSERT_TRUE(editor.Open(text, error)) << error.message;
        window->Run(editor);
    }
    std::string Saved() const { return ReadWholeText(folder.File("made.qvjob")); }

    TempFolder folder;
    TGtkUser user;
};

TEST_F(GtkEdit, FromNothingToACaption) {
    Add(user, "Add0");
    PickVariable(user, kOpen, "edtImageFile", 0);
    user.Press(kOpen, "btnOk");
    Add(user, "Add5");
    user.In(kText, [] {
        gtk_entry_set_text(GTK_ENTRY(Widget(kText, "edtText")), "(c) me");
        gtk_combo_box_set_active(GTK_COMBO_BOX(Widget(kText, "cbYPos")), 2);
    });
    user.Press(kText, "btnOk");
    Add(user, "Add2");
    user.Press("TfrmResizeImageAction", "btnCancel");
    Add(user, "Add1");
    user.In(kSave,
            [] { gtk_entry_set_text(GTK_ENTRY(Widget(kSave, "edtImageFile")), "{out}/made.jpg"); });
    user.Press(kSave, "btnOk");
    user.Press(kEditor, "Save");
    user.Press(kEditor, "Close");
    Edit(std::nullopt);
    EXPECT_EQ(Saved(),
              "[Open Image]\nsource=0\nimage_file={file}\n\n"
              "[Draw Text on Image]\ntext=(c) me\nfont_name=Tahoma\nfont_size=16\nfont_color=0\n"
              "font_styles=0\nx_pos=3\ny_pos=2\ncustom_x=0\ncustom_y=0\n\n"
              "[Save Image]\ndest=0\nimage_file={out}/made.jpg\nformat=0\nsave_meta=0\n");
    ASSERT_TRUE(MakeGradient(zm24RGB, 60, 40)->Write(folder.Name("a.png"), ioPNG, nullptr));
    const TProcessResult result =
        RunProcess(ZM_MODULE_DIR "/qvrun run " + folder.File("made.qvjob").string() + " " +
                       folder.File("a.png").string() + " --output " + folder.Path().string(),
                   folder.Path());
    EXPECT_EQ(result.exit_status, 0) << result.standard_error;
    EXPECT_TRUE(std::filesystem::exists(folder.File("made.jpg")));
}

TEST_F(GtkEdit, ChangesAreAskedForBeforeTheyAreLost) {
    user.Press(kEditor, "Down");
    user.Press(kEditor, "Close");
    user.Respond("GtkMessageDialog", GTK_RESPONSE_CANCEL);
    user.Press(kEditor, "Close");
    user.In("GtkMessageDialog", [] {
        GtkDialog* const dialog = GTK_DIALOG(FindWindow("GtkMessageDialog"));
        gtk_button_clicked(GTK_BUTTON(gtk_dialog_get_widget_for_response(dialog, 2)));
    });
    Edit("[Open Image]\n[Save Image]\n");
    EXPECT_EQ(Saved(), "") << "discarded changes were saved";

    user.Press(kEditor, "Remove");
    user.Press(kEditor, "Close");
    user.Respond("GtkMessageDialog", 1);
    Edit("# mine\n[Open Image]\n# last\n[Save Image]\n");
    EXPECT_EQ(Saved(), "# mine\n# last\n[Save Image]\n");
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
    const std::string program = (std::filesystem::path(ZM_MODULE_DIR) / "qvrun").string();
    const TProcessResult result = RunProcess("env -u DISPLAY -u WAYLAND_DISPLAY " + program +
                                                 " edit " + folder.File("new.qvjob").string(),
                                             folder.Path());
    EXPECT_EQ(result.exit_status, 2);
    EXPECT_NE(result.standard_error.find("cannot open the job editor: "), std::string::npos)
        << result.standard_error;
    EXPECT_FALSE(std::filesystem::exists(folder.File("new.qvjob")));
}

}  // namespace
}  // namespace zm::test
