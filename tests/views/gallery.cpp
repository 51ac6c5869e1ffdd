// Saves a picture of every form as the toolkit shows it: gallery PERCENT FOLDER PREFIX
#include <cctype>
#include <cstdlib>
#include <iostream>
#include <map>

#include "actions/views/uFormToolkit.h"
#include "engine/foundation/zmstrings.h"
#include "tests/actions/formsupport.h"
#include "tests/views/formuser.h"

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

/// "resize-image" for "Resize Image".
std::u16string PictureName(const TActionFormDesign& design) {
    std::u16string name;
    for (const char16_t letter : design.caption) {
        name += letter == u' ' ? u'-' : static_cast<char16_t>(std::tolower(letter));
    }
    return name;
}

bool ShowAll(IActionFormToolkit& toolkit, const std::string& percent, const std::string& start) {
    bool all_saved = true;
    for (const TActionFormDesign* design : AllForms()) {
        TActionForm form(*design);
        form.Load(Settings(kSettings.at(design->class_name)));
        const std::u16string file_name =
            Utf16FromUtf8(start) + PictureName(*design) + Utf16FromUtf8("-" + percent + ".png");
        TUser user;
        // Controls fade into their states, and are painted when nothing else is left to do.
        int waits = 40;
        user.WhenReady(design->caption, [&waits](TWindow) { return --waits == 0; });
        user.In(design->caption,
                [&](TWindow window) { all_saved = SavePicture(window, file_name) && all_saved; });
        user.Press(*design, u"btnCancel");
        std::u16string reason;
        all_saved =
            toolkit.ShowModal(form, {std::atoi(percent.c_str()), nullptr}, reason) && all_saved;
    }
    return all_saved;
}

int Main(int count, char** arguments) {
    std::u16string reason;
    IActionFormToolkit* const toolkit = FormToolkitProvider()(reason);
    if (count != 4 || toolkit == nullptr) {
        std::cerr << "gallery PERCENT FOLDER PREFIX; " << Utf8FromUtf16(reason) << '\n';
        return 2;
    }
    return ShowAll(*toolkit, arguments[1], std::string(arguments[2]) + "/" + arguments[3]) ? 0 : 1;
}

}  // namespace
}  // namespace zm::test

int main(int count, char** arguments) {
    return zm::test::Main(count, arguments);
}
