// The real dialogs of the built plug-in on a display, worked by their widgets.
#include <string>
#include <vector>

#include "actions/uActionFormLayout.h"
#include "actions/views/gtk/uGtkModule.h"
#include "actions/views/gtk/uGtkTexts.h"
#include "tests/actions/formsupport.h"
#include "tests/plugin/testhost.h"
#include "tests/views/gtksupport.h"

// The source folder's name is ASCII where the tests are built.
#define ZM_WIDE_TEXT(text) u##text
#define ZM_WIDE(text) ZM_WIDE_TEXT(text)

namespace zm::test {
namespace {

constexpr char kOpen[] = "TfrmOpenImageAction";
constexpr char kResize[] = "TfrmResizeImageAction";
constexpr char kText[] = "TfrmTextOnImageAction";
constexpr char kBorder[] = "TfrmAddBorderAction";

GtkEntry* Entry(const std::string& window, const std::string& name) {
    return GTK_ENTRY(Widget(window, name));
}

void Choose(const std::string& window, const std::string& list, int index) {
    gtk_combo_box_set_active(GTK_COMBO_BOX(Widget(window, list)), index);
}

void Toggle(const std::string& window, const std::string& button, bool on) {
    gtk_toggle_button_set_active(GTK_TOGGLE_BUTTON(Widget(window, button)), on ? TRUE : FALSE);
}

bool IsEnabled(const std::string& window, const std::string& name) {
    return gtk_widget_is_sensitive(Widget(window, name)) != FALSE;
}

class GtkForms : public testing::Test {
protected:
    /// Configures a step while the user acts; the text afterwards. A block that stays is the same
    /// one, byte for byte.
    std::u16string Configure(std::int32_t action, const std::u16string& text, TLongBool result) {
        TLoadedModule& module = LoadedModule();
        TTestStep step(module.host, text);
        const TAFActionParams before = step.params;
        EXPECT_EQ(module.caller->Actions().ConfigAction(action, &step.params), result);
        EXPECT_TRUE(result != 0 ||
                    (step.params.PPtr == before.PPtr && step.params.Size == before.Size));
        EXPECT_EQ(module.host.HeapFaults(), 0);
        EXPECT_TRUE(module.host.Lines().empty());
        return step.Text();
    }

    TGtkUser user;
};

/// The first of all: later ones have started the toolkit.
TEST(GtkStart, WithoutADisplayTheLogTellsWhy) {
    const std::string display = getenv("DISPLAY");
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
    setenv("DISPLAY", display.c_str(), 1);
}

TEST_F(GtkForms, TypedAndToggledValuesAreStored) {
    user.In(kResize, [] {
        EXPECT_STREQ(gtk_entry_get_text(Entry(kResize, "edtImageW")), "300");
        EXPECT_STREQ(gtk_label_get_text(GTK_LABEL(Widget(kResize, "lblWidth"))), "Max Width:");
        Toggle(kResize, "rgCalcMethod1", true);
        EXPECT_STREQ(gtk_label_get_text(GTK_LABEL(Widget(kResize, "lblHeight"))),
                     "Max Short Side:");
        Choose(kResize, "cbUnitsW", 1);
        Choose(kResize, "cbUnitsH", 1);
        gtk_entry_set_text(Entry(kResize, "edtImageW"), "5_0&%");
        EXPECT_STREQ(gtk_entry_get_text(Entry(kResize, "edtImageH")), "5_0&%") << "not linked";
        Toggle(kResize, "cbKeepAspectRatio", false);
        gtk_entry_set_text(Entry(kResize, "edtImageH"), "\u00E4\U0001F600");
    });
    user.Press(kResize, "btnOk");
    EXPECT_EQ(Configure(gaResizeImage, u"other=1\r\n", -1),
              u"calc_method=1\r\nimage_w=5_0&%\r\nimage_h=\u00E4\U0001F600\r\nunits_w=1\r\n"
              u"units_h=1\r\nkeep_aspect_ratio=0\r\n");
}

TEST_F(GtkForms, AFailedCheckKeepsTheDialogOpen) {
    user.Press(kOpen, "btnOk");
    user.In(kOpen, [] {
        EXPECT_TRUE(IsEnabled(kOpen, "edtImageFile"));
        Toggle(kOpen, "rgSource1", true);
        EXPECT_FALSE(IsEnabled(kOpen, "edtImageFile"));
        EXPECT_FALSE(IsEnabled(kOpen, "btnSelectFile"));
    });
    user.PressKey(kOpen, GDK_KEY_Return);
    EXPECT_EQ(Configure(gaOpenImage, u"", -1), u"source=1\r\n");
}

TEST_F(GtkForms, CancelEscapeAndTheCloseBoxLeaveTheBlock) {
    const std::u16string odd = u"image_file=a\nb\r=c\r\n\r\nsource=9";
    const auto change = [] { gtk_entry_set_text(Entry(kOpen, "edtImageFile"), "changed"); };
    user.In(kOpen, change);
    user.Press(kOpen, "btnCancel");
    EXPECT_EQ(Configure(gaOpenImage, odd, 0), odd);
    user.In(kOpen, change);
    user.PressKey(kOpen, GDK_KEY_Escape);
    EXPECT_EQ(Configure(gaOpenImage, odd, 0), odd);
    user.In(kOpen, change);
    user.WhenReady(kOpen, [](GtkWidget* window) {
        gtk_window_close(GTK_WINDOW(window));
        return true;
    });
    EXPECT_EQ(Configure(gaOpenImage, odd, 0), odd);
}

TEST_F(GtkForms, VariablesGoToTheCaretOfTheFocusedEdit) {
    LoadedModule().host.selected_variable = u"{name}";
    user.In(kText, [] {
        GtkEntry* const entry = Entry(kText, "edtText");
        gtk_widget_grab_focus(GTK_WIDGET(entry));
        gtk_entry_set_text(entry, "\U0001F600ab");
        gtk_editable_set_position(GTK_EDITABLE(entry), 2);
    });
    user.Press(kText, "SpeedButton1");
    user.WhenReady(kText, [](GtkWidget* window) {
        GtkWidget* const entry = Widget(kText, "edtText");
        EXPECT_EQ(gtk_window_get_focus(GTK_WINDOW(window)), entry) << "the button took the focus";
        EXPECT_EQ(gtk_editable_get_position(GTK_EDITABLE(entry)), 8);
        gtk_widget_grab_focus(Widget(kText, "cbXPos"));
        return true;
    });
    // On another control than an edit an error is shown, and the dialog stays.
    user.Press(kText, "SpeedButton1");
    user.Respond("GtkMessageDialog", GTK_RESPONSE_CLOSE);
    user.Press(kText, "btnOk");
    EXPECT_TRUE(Configure(gaTextOnImage, u"", -1).starts_with(u"text=\U0001F600a{name}b\r\n"));
}

TEST_F(GtkForms, PickersGiveColorsAndFonts) {
    user.In(kBorder, [] { Choose(kBorder, "cbColor", 0); });
    user.WhenReady("GtkColorChooserDialog", [](GtkWidget* dialog) {
        const GdkRGBA color{1.0, 0.5, 0.0, 1.0};
        gtk_color_chooser_set_rgba(GTK_COLOR_CHOOSER(dialog), &color);
        return true;
    });
    user.Respond("GtkColorChooserDialog", GTK_RESPONSE_OK);
    // "Custom..." once more: a cancelled picker leaves the colour.
    user.In(kBorder, [] { Choose(kBorder, "cbColor", 0); });
    user.Respond("GtkColorChooserDialog", GTK_RESPONSE_CANCEL);
    user.Press(kBorder, "btnOk");
    EXPECT_TRUE(Configure(gaAddBorder, u"", -1).ends_with(u"color=33023\r\n"));  // 0080FF
    user.In(kBorder, [] {
        EXPECT_EQ(gtk_combo_box_get_active(GTK_COMBO_BOX(Widget(kBorder, "cbColor"))), 21);
        Choose(kBorder, "cbColor", 10);
    });
    user.Press(kBorder, "btnOk");
    EXPECT_TRUE(Configure(gaAddBorder, u"color=33023", -1).ends_with(u"color=255\r\n"));

    user.Press(kText, "btnSelectFont");
    user.WhenReady("GtkFontChooserDialog", [](GtkWidget* dialog) {
        gtk_font_chooser_set_font(GTK_FONT_CHOOSER(dialog), "DejaVu Sans Bold 24");
        return true;
    });
    user.Respond("GtkFontChooserDialog", GTK_RESPONSE_OK);
    user.Press(kText, "btnOk");
    EXPECT_EQ(Configure(gaTextOnImage, u"text=x\r\nfont_styles=4\r\nfont_color=255", -1),
              u"text=x\r\nfont_name=DejaVu Sans\r\nfont_size=24\r\nfont_color=255\r\n"
              u"font_styles=5\r\nx_pos=3\r\ny_pos=3\r\ncustom_x=0\r\ncustom_y=0\r\n");
}

TEST_F(GtkForms, AFileIsPickedFromTheFolderOfThePresentOne) {
    const std::string picture = ZM_SOURCE_DIR "/README.md";
    user.Press(kOpen, "btnSelectFile");
    user.WhenReady("GtkFileChooserDialog", [](GtkWidget* dialog) {
        GtkFileChooser* const chooser = GTK_FILE_CHOOSER(dialog);
        char* const folder = gtk_file_chooser_get_current_folder(chooser);
        const bool is_there = folder != nullptr && std::string(folder) == ZM_SOURCE_DIR "/docs";
        g_free(folder);
        if (!is_there) {
            return false;  // folders are read aside
        }
        GSList* const filters = gtk_file_chooser_list_filters(chooser);
        EXPECT_EQ(g_slist_length(filters), 2u);
        gtk_file_chooser_set_filter(chooser, GTK_FILE_FILTER(g_slist_nth_data(filters, 1)));
        g_slist_free(filters);
        return true;
    });
    // A name that is set while the chooser still reads another folder is forgotten: it is set anew
    // until it stays.
    user.WhenReady("GtkFileChooserDialog", [&picture, asked = 0](GtkWidget* dialog) mutable {
        constexpr int kAsksBetween = 100;  // half a second, longer than reading a folder
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
    user.Press(kOpen, "btnOk");
    EXPECT_EQ(Configure(gaOpenImage, u"image_file=" ZM_WIDE(ZM_SOURCE_DIR) u"/docs/x.png", -1),
              u"source=0\r\nimage_file=" ZM_WIDE(ZM_SOURCE_DIR) u"/README.md\r\n");
}

TEST_F(GtkForms, TextsThatTheToolkitCannotHoldSurvive) {
    const std::u16string huge(1 << 20, u'w');
    user.In(kText, [] {
        EXPECT_FALSE(gtk_editable_get_editable(GTK_EDITABLE(Widget(kText, "edtText"))));
    });
    user.Press(kText, "btnOk");
    EXPECT_TRUE(
        Configure(gaTextOnImage, u"text=" + huge, -1).starts_with(u"text=" + huge + u"\r\n"));

    const std::u16string odd = u"\xD800x\xDC80\xDBFFy";
    user.In(kText, [] {
        int end = 1;
        gtk_editable_insert_text(GTK_EDITABLE(Widget(kText, "edtText")), "_", 1, &end);
    });
    user.Press(kText, "btnOk");
    EXPECT_TRUE(Configure(gaTextOnImage, u"text=" + odd, -1)
                    .starts_with(u"text=\xD800_x\xDC80\xDBFFy\r\n"));
}

TEST(GtkTexts, CaptionsAndCarets) {
    EXPECT_EQ(MnemonicText(u"&Width && _x&"), "_Width & __x&");
    EXPECT_EQ(CharactersBefore(u"\U0001F600ab", 3), 2);
    EXPECT_EQ(UnitsBefore(u"\U0001F600ab", 2), 3);
    EXPECT_EQ(UnitsBefore(u"ab", 9), 2);
}

struct TLook {
    int percent;
    const char* font;
};

/// Every form, shown directly so that the scale is ours.
class GtkLayout : public testing::TestWithParam<TLook> {
protected:
    static IActionFormToolkit* Toolkit() {
        std::string error_text;
        static platform::TLibrary* const library =
            platform::LoadLibraryFile(Utf16FromUtf8(ZM_MODULE_DIR "/Graphics-gtk.so"), error_text)
                .release();
        const auto entry =
            reinterpret_cast<TGtkFormToolkit>(library->FindSymbol(kGtkFormToolkitName));
        std::u16string reason;
        return entry(reason);
    }
};

void ExpectUnclipped(GtkWidget* window, const TFormControl& control) {
    GtkWidget* const widget = FindWidget(window, ViewText(control.name));
    ASSERT_NE(widget, nullptr);
    const int width = gtk_widget_get_allocated_width(widget);
    int needed_width = 0;
    int needed_height = 0;
    gtk_widget_get_preferred_width(widget, nullptr, &needed_width);
    gtk_widget_get_preferred_height_for_width(widget, width, nullptr, &needed_height);
    const std::string name = ViewText(control.name);
    if (control.kind != fcEdit && control.kind != fcWrappedLabel) {
        EXPECT_GE(width, needed_width) << name;
    }
    EXPECT_GE(gtk_widget_get_allocated_height(widget), needed_height) << name;
    int x = 0;
    int y = 0;
    gtk_widget_translate_coordinates(widget, window, 0, 0, &x, &y);
    EXPECT_LE(x + width, gtk_widget_get_allocated_width(window)) << name;
    EXPECT_LE(y + needed_height, gtk_widget_get_allocated_height(window)) << name;
}

/// Presses the tab key until the focus is back; names of the controls that had it.
std::vector<std::string> FocusRound(GtkWidget* window) {
    std::vector<std::string> names;
    gtk_window_set_focus(GTK_WINDOW(window), nullptr);
    while (names.size() < 50) {
        if (gtk_widget_child_focus(window, GTK_DIR_TAB_FORWARD) == FALSE) {
            break;
        }
        GtkWidget* named = gtk_window_get_focus(GTK_WINDOW(window));
        // A drop-down list's inner button takes the focus for it.
        while (g_str_has_prefix(gtk_widget_get_name(named), "Gtk")) {
            named = gtk_widget_get_parent(named);
        }
        if (!names.empty() && gtk_widget_get_name(named) == names.front()) {
            break;
        }
        names.emplace_back(gtk_widget_get_name(named));
    }
    return names;
}

std::vector<std::string> ExpectedFocus(const TActionForm& form) {
    std::vector<std::string> names;
    for (const std::int32_t control : TabOrder(form.Design())) {
        const TFormControl& each = form.Design().controls[static_cast<std::size_t>(control)];
        const bool takes_focus = each.kind >= fcEdit && each.kind <= fcColorBox;
        if ((takes_focus || each.kind == fcButton) && form.State(control).enabled) {
            names.push_back(ViewText(each.name) + (each.kind == fcRadioGroup ? "0" : ""));
        }
    }
    return names;
}

TEST_P(GtkLayout, NothingIsClippedAndTheFocusGoesInOrder) {
    IActionFormToolkit* const toolkit = Toolkit();
    ASSERT_NE(toolkit, nullptr);
    g_object_set(gtk_settings_get_default(), "gtk-font-name", GetParam().font, nullptr);
    for (const TActionFormDesign* design : AllForms()) {
        TActionForm form(*design);
        TGtkUser user;
        const std::string name = ViewText(design->class_name);
        SCOPED_TRACE(name);
        // No window manager gives the window the keyboard here.
        user.WhenReady(name, [](GtkWidget* window) {
            gdk_window_focus(gtk_widget_get_window(window), GDK_CURRENT_TIME);
            return gtk_window_has_toplevel_focus(GTK_WINDOW(window)) != FALSE;
        });
        user.WhenReady(name, [&](GtkWidget* window) {
            for (const TFormControl& control : design->controls) {
                ExpectUnclipped(window, control);
            }
            EXPECT_EQ(FocusRound(window), ExpectedFocus(form));
            return true;
        });
        user.Press(name, "btnCancel");
        std::u16string reason;
        EXPECT_TRUE(toolkit->ShowModal(form, {GetParam().percent, nullptr}, reason));
        EXPECT_EQ(form.Result(), frCancel);
    }
}

/// Waits for a size, which comes in its own time.
void ResizeTo(TGtkUser& user, int width, int height, int wanted_width, int wanted_height) {
    user.WhenReady(kText, [=](GtkWidget* window) {
        gtk_window_resize(GTK_WINDOW(window), width, height);
        return true;
    });
    user.WhenReady(kText, [=](GtkWidget* window) {
        return gtk_widget_get_allocated_width(window) == wanted_width &&
               gtk_widget_get_allocated_height(window) == wanted_height;
    });
}

TEST_F(GtkForms, TheTextFormStretches) {
    const auto expect_panel = [](int width, int height) {
        GtkWidget* const panel = Widget(kText, "panSample");
        EXPECT_EQ(gtk_widget_get_allocated_width(panel), width);
        EXPECT_EQ(gtk_widget_get_allocated_height(panel), height);
    };
    g_object_set(gtk_settings_get_default(), "gtk-font-name", "DejaVu Sans 10", nullptr);
    ResizeTo(user, 662, 449, 662, 449);
    user.In(kText, [=] { expect_panel(550, 182); });
    ResizeTo(user, 1, 1, 388, 399);
    user.In(kText, [=] { expect_panel(276, 132); });
    user.Press(kText, "btnCancel");
    Configure(gaTextOnImage, u"", 0);
}

INSTANTIATE_TEST_SUITE_P(Scales, GtkLayout,
                         testing::Values(TLook{100, "DejaVu Sans 10"}, TLook{150, "DejaVu Sans 10"},
                                         TLook{250, "DejaVu Sans 10"},
                                         TLook{100, "DejaVu Sans Bold 15"}));

}  // namespace
}  // namespace zm::test
