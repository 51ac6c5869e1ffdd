// Saves a picture of every form as the toolkit shows it: gtk_gallery PERCENT FOLDER
#include <cstdlib>
#include <iostream>
#include <map>

#include "actions/views/gtk/uGtkModule.h"
#include "actions/views/gtk/uGtkTexts.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/module.h"
#include "tests/actions/formsupport.h"
#include "tests/views/gtksupport.h"

namespace zm::test {
namespace {

/// Settings that show a form at work.
const std::map<std::u16string, std::u16string> kSettings{
    {u"TfrmOpenImageAction", u"image_file={file}"},
    {u"TfrmSaveImageAction", u"image_file={out}/{name}-small.jpg\r\nsave_meta=1"},
    {u"TfrmResizeImageAction", u"calc_method=1\r\nimage_w=1024\r\nimage_h=768"},
    {u"TfrmCropImageAction", u"l=10\r\nul=1\r\nr=-10\r\nur=1\r\nb=-1"},
    {u"TfrmRotateImageAction", u"action=1"},
    {u"TfrmTextOnImageAction",
     u"text=Summer {date}\r\nfont_name=DejaVu Sans\r\nfont_size=28\r\n"
     u"font_color=11162880\r\nfont_styles=1\r\nx_pos=1"},
    {u"TfrmImageOnImageAction", u"image_file=logo.png\r\ny_pos=2\r\nopacity=60"},
    {u"TfrmAddBorderAction", u"l=12\r\nt=12\r\nr=12\r\nb=12\r\ncolor=8421376"},
};

/// The file is named after the form's action: "resize" for TfrmResizeImageAction.
std::string PictureName(const TActionFormDesign& design) {
    std::string name;
    for (const char16_t letter : design.caption) {
        name += letter == u' ' ? '-' : static_cast<char>(std::tolower(static_cast<int>(letter)));
    }
    return name;
}

bool SavePicture(GtkWidget* window, const std::string& file_name) {
    const int width = gtk_widget_get_allocated_width(window);
    const int height = gtk_widget_get_allocated_height(window);
    GdkPixbuf* picture =
        gdk_pixbuf_get_from_window(gtk_widget_get_window(window), 0, 0, width, height);
    const bool saved =
        picture != nullptr && gdk_pixbuf_save(picture, file_name.c_str(), "png", nullptr, nullptr);
    g_clear_object(&picture);
    return saved;
}

bool ShowAll(IActionFormToolkit& toolkit, std::int32_t percent, const std::string& folder) {
    bool all_saved = true;
    for (const TActionFormDesign* design : AllForms()) {
        TActionForm form(*design);
        form.Load(Settings(kSettings.at(design->class_name)));
        const std::string file_name =
            folder + "/linux-" + PictureName(*design) + "-" + std::to_string(percent) + ".png";
        TGtkUser user;
        const std::string name = ViewText(design->class_name);
        // Widgets fade into their states; 400 ms later they have arrived.
        int waits = 80;
        user.WhenReady(name, [&waits](GtkWidget*) { return --waits == 0; });
        user.WhenReady(name, [&](GtkWidget* window) {
            all_saved = SavePicture(window, file_name) && all_saved;
            return true;
        });
        user.Press(name, "btnCancel");
        std::u16string reason;
        all_saved = toolkit.ShowModal(form, {percent, nullptr}, reason) && all_saved;
    }
    return all_saved;
}

int Main(int count, char** arguments) {
    std::string error_text;
    const auto library =
        platform::LoadLibraryFile(Utf16FromUtf8(ZM_MODULE_DIR "/Graphics-gtk.so"), error_text);
    if (count != 3 || library == nullptr) {
        std::cerr << "gtk_gallery PERCENT FOLDER; " << error_text << '\n';
        return 2;
    }
    std::u16string reason;
    IActionFormToolkit* const toolkit =
        reinterpret_cast<TGtkFormToolkit>(library->FindSymbol(kGtkFormToolkitName))(reason);
    if (toolkit == nullptr) {
        std::cerr << Utf8FromUtf16(reason) << '\n';
        return 1;
    }
    const bool done = ShowAll(*toolkit, std::atoi(arguments[1]), arguments[2]);
    std::_Exit(done ? 0 : 1);  // the toolkit must not be unloaded
}

}  // namespace
}  // namespace zm::test

int main(int count, char** arguments) {
    return zm::test::Main(count, arguments);
}
