// What only the dialogs of this toolkit do. Linked first: later tests start the toolkit.
#include <cstdlib>
#include <string>
#include <vector>

#include "actions/views/gtk/uGtkTexts.h"
#include "engine/foundation/zmstrings.h"
#include "tests/support/testfiles.h"
#include "tests/views/formsfixture.h"
#include "tests/views/gtkwidgets.h"

namespace zm::test {
namespace {

TEST(GtkStart, WithoutADisplayTheLogTellsWhy) {
    const char* const display = std::getenv("DISPLAY");
    const std::string name = display == nullptr ? "" : display;
    unsetenv("DISPLAY");
    TLoadedModule& module = LoadedModule();
    TTestStep step(module.host, u"l=4");
    EXPECT_EQ(module.caller->Actions().ConfigAction(gaCropImage, &step.params), 0);
    EXPECT_EQ(step.Text(), u"l=4");
    EXPECT_EQ(module.host.Lines(),
              (std::vector<THostLine>{{2,
                                       u"The settings dialog cannot be shown: there is no "
                                       u"display to show it on."}}));
    module.host.ForgetReports();
    if (display != nullptr) {
        setenv("DISPLAY", name.c_str(), 1);
    }
}

TEST_F(RealForms, PickersGiveColorsAndFonts) {
    constexpr char16_t kColor[] = u"GtkColorChooserDialog";
    constexpr char16_t kFont[] = u"GtkFontChooserDialog";
    const auto ask_for_custom = [](const TFormWindow& form) { form.Choose(u"cbColor", 0); };
    user.In(AddBorderForm(), ask_for_custom);
    user.In(kColor, [](TWindow dialog) {
        const GdkRGBA color{1.0, 0.5, 0.0, 1.0};
        gtk_color_chooser_set_rgba(GTK_COLOR_CHOOSER(dialog), &color);
    });
    Respond(user, kColor, GTK_RESPONSE_OK);
    // "Custom..." once more: a cancelled picker leaves the colour.
    user.In(AddBorderForm(), ask_for_custom);
    Respond(user, kColor, GTK_RESPONSE_CANCEL);
    user.Press(AddBorderForm(), u"btnOk");
    EXPECT_TRUE(Configure(gaAddBorder, u"", -1).ends_with(u"color=33023\r\n"));  // 0080FF
    user.In(AddBorderForm(), [](const TFormWindow& form) {
        EXPECT_EQ(form.Chosen(u"cbColor"), 21);
        form.Choose(u"cbColor", 10);
    });
    user.Press(AddBorderForm(), u"btnOk");
    EXPECT_TRUE(Configure(gaAddBorder, u"color=33023", -1).ends_with(u"color=255\r\n"));

    user.Press(TextOnImageForm(), u"btnSelectFont");
    user.In(kFont, [](TWindow dialog) {
        gtk_font_chooser_set_font(GTK_FONT_CHOOSER(dialog), "DejaVu Sans Bold 24");
    });
    Respond(user, kFont, GTK_RESPONSE_OK);
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_EQ(Configure(gaTextOnImage, u"text=x\r\nfont_styles=4\r\nfont_color=255", -1),
              u"text=x\r\nfont_name=DejaVu Sans\r\nfont_size=24\r\nfont_color=255\r\n"
              u"font_styles=5\r\nx_pos=3\r\ny_pos=3\r\ncustom_x=0\r\ncustom_y=0\r\n");

    // A size that cannot be shown stays when the font is confirmed as it is.
    user.Press(TextOnImageForm(), u"btnSelectFont");
    Respond(user, kFont, GTK_RESPONSE_OK);
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_TRUE(Configure(gaTextOnImage, u"text=x\r\nfont_name=DejaVu Sans\r\nfont_size=-7", -1)
                    .starts_with(u"text=x\r\nfont_name=DejaVu Sans\r\nfont_size=-7\r\n"));
}

/// True once the chooser shows the folder: folders are read aside.
bool ShowsFolder(TWindow dialog, const std::string& wanted) {
    char* const folder = gtk_file_chooser_get_current_folder(GTK_FILE_CHOOSER(dialog));
    const bool is_there = folder != nullptr && wanted == folder;
    g_free(folder);
    return is_there;
}

TEST_F(RealForms, AFileIsPickedFromTheFolderOfThePresentOne) {
    constexpr char16_t kChooser[] = u"GtkFileChooserDialog";
    const TempFolder folder;
    const std::string picture = folder.File("picture.png");
    WriteFileBytes(picture, {1, 2, 3});
    user.Press(OpenImageForm(), u"btnSelectFile");
    user.WhenReady(kChooser,
                   [&folder](TWindow dialog) { return ShowsFolder(dialog, folder.Path()); });
    // A name that is set while the chooser still reads another folder is forgotten: it is set anew
    // until it stays.
    user.WhenReady(kChooser, [&picture, asked = 0](TWindow dialog) mutable {
        constexpr int kAsksBetween = 50;  // half a second, longer than reading a folder
        GtkFileChooser* const chooser = GTK_FILE_CHOOSER(dialog);
        if (asked++ % kAsksBetween == 0) {
            gtk_file_chooser_set_filename(chooser, picture.c_str());
            return false;
        }
        char* const name = gtk_file_chooser_get_filename(chooser);
        const bool ready = name != nullptr && picture == name;
        g_free(name);
        if (ready) {
            gtk_dialog_response(GTK_DIALOG(dialog), GTK_RESPONSE_ACCEPT);
        }
        return ready;
    });
    user.Press(OpenImageForm(), u"btnOk");
    EXPECT_EQ(Configure(gaOpenImage, u"image_file=" + folder.Name("x.png"), -1),
              u"source=0\r\nimage_file=" + folder.Name("picture.png") + u"\r\n");
}

TEST_F(RealForms, TextsThatTheToolkitCannotHoldSurvive) {
    const std::u16string huge(1 << 20, u'w');
    user.In(TextOnImageForm(), [](const TFormWindow& form) {
        EXPECT_FALSE(gtk_editable_get_editable(GTK_EDITABLE(form.Control(u"edtText"))));
    });
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_TRUE(
        Configure(gaTextOnImage, u"text=" + huge, -1).starts_with(u"text=" + huge + u"\r\n"));

    const std::u16string odd = u"\xD800x\xDC80\xDBFFy";
    user.In(TextOnImageForm(), [](const TFormWindow& form) {
        int end = 1;
        gtk_editable_insert_text(GTK_EDITABLE(form.Control(u"edtText")), "_", 1, &end);
    });
    user.Press(TextOnImageForm(), u"btnOk");
    EXPECT_TRUE(Configure(gaTextOnImage, u"text=" + odd, -1)
                    .starts_with(u"text=\xD800_x\xDC80\xDBFFy\r\n"));
}

TEST(GtkTexts, CaptionsAndCarets) {
    EXPECT_EQ(MnemonicText(u"&Width && _x&"), "_Width & __x&");
    EXPECT_EQ(CharactersBefore(u"\U0001F600ab", 3), 2);
    EXPECT_EQ(UnitsBefore(u"\U0001F600ab", 2), 3);
    EXPECT_EQ(UnitsBefore(u"ab", 9), 2);
}

GtkAllocation SizeOf(TWindow widget) {
    GtkAllocation size{};
    gtk_widget_get_allocation(GTK_WIDGET(widget), &size);
    return size;
}

/// Resizes the text form and waits for the size, which comes in its own time; then its panel has
/// the size told.
void ResizeTo(TUser& user, GtkRequisition asked, GtkRequisition wanted, GtkRequisition panel) {
    const std::u16string& title = TextOnImageForm().caption;
    user.In(title, [asked](TWindow window) {
        gtk_window_resize(GTK_WINDOW(window), asked.width, asked.height);
    });
    user.WhenReady(title, [wanted](TWindow window) {
        const GtkAllocation size = SizeOf(window);
        return size.width == wanted.width && size.height == wanted.height;
    });
    user.In(TextOnImageForm(), [panel](const TFormWindow& form) {
        const GtkAllocation size = SizeOf(form.Control(u"panSample"));
        EXPECT_EQ(size.width, panel.width);
        EXPECT_EQ(size.height, panel.height);
    });
}

TEST_F(RealForms, TheTextFormStretches) {
    // The toolkit starts with the first form.
    user.Press(TextOnImageForm(), u"btnCancel");
    Configure(gaTextOnImage, u"", 0);
    UseDialogFont("DejaVu Sans 10");
    ResizeTo(user, {662, 449}, {662, 449}, {550, 182});
    ResizeTo(user, {1, 1}, {388, 399}, {276, 132});
    user.Press(TextOnImageForm(), u"btnCancel");
    Configure(gaTextOnImage, u"", 0);
}

}  // namespace
}  // namespace zm::test
