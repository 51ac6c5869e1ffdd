// Saves a picture of every form as the system shows it: win32_gallery PERCENT FOLDER
#include <windows.h>

#include <algorithm>
#include <cctype>
#include <cstdlib>
#include <iostream>
#include <map>
#include <vector>

#include "actions/uActionFormLayout.h"
#include "actions/views/uFormToolkit.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmstrings.h"
#include "tests/actions/formsupport.h"
#include "tests/views/win32support.h"

namespace zm::test {
namespace {

/// Settings that show a form at work.
const std::map<std::u16string, std::u16string> kSettings{
    {u"TfrmOpenImageAction", u"image_file={file}"},
    {u"TfrmSaveImageAction", u"image_file={out}\\{name}-small.jpg\r\nsave_meta=1"},
    {u"TfrmResizeImageAction", u"calc_method=1\r\nimage_w=1024\r\nimage_h=768"},
    {u"TfrmCropImageAction", u"l=10\r\nul=1\r\nr=-10\r\nur=1\r\nb=-1"},
    {u"TfrmRotateImageAction", u"action=1"},
    {u"TfrmTextOnImageAction",
     u"text=Summer {date}\r\nfont_name=DejaVu Sans\r\nfont_size=28\r\n"
     u"font_color=11162880\r\nfont_styles=1\r\nx_pos=1"},
    {u"TfrmImageOnImageAction", u"image_file=logo.png\r\ny_pos=2\r\nopacity=60"},
    {u"TfrmAddBorderAction", u"l=12\r\nt=12\r\nr=12\r\nb=12\r\ncolor=8421376"},
};

std::u16string PictureName(const TActionFormDesign& design) {
    std::u16string name;
    for (const char16_t letter : design.caption) {
        name += letter == u' ' ? u'-' : static_cast<char16_t>(std::tolower(letter));
    }
    return name;
}

/// The client area as it stands on the screen.
bool SavePicture(HWND window, const std::u16string& file_name) {
    RECT client{};
    GetClientRect(window, &client);
    TZmBitmap picture;
    picture.Allocate(client.right, client.bottom, zm24RGB);
    const HDC device = GetDC(window);
    const HDC memory = CreateCompatibleDC(device);
    const HBITMAP copy = CreateCompatibleBitmap(device, client.right, client.bottom);
    const HGDIOBJ old = SelectObject(memory, copy);
    BitBlt(memory, 0, 0, client.right, client.bottom, device, 0, 0, SRCCOPY);
    SelectObject(memory, old);
    BITMAPINFOHEADER format{};
    format.biSize = sizeof(format);
    format.biWidth = client.right;
    format.biHeight = -client.bottom;  // the top row first
    format.biPlanes = 1;
    format.biBitCount = 24;
    const auto row_bytes = (static_cast<std::size_t>(client.right) * 3 + 3) / 4 * 4;
    std::vector<std::uint8_t> pixels(row_bytes * static_cast<std::size_t>(client.bottom));
    GetDIBits(memory, copy, 0, static_cast<UINT>(client.bottom), pixels.data(),
              reinterpret_cast<BITMAPINFO*>(&format), DIB_RGB_COLORS);
    for (std::int32_t row = 0; row < client.bottom; ++row) {
        std::copy_n(&pixels[row_bytes * static_cast<std::size_t>(row)],
                    static_cast<std::size_t>(client.right) * 3, picture.GetRow(row));
    }
    DeleteDC(memory);
    DeleteObject(copy);
    ReleaseDC(window, device);
    return picture.Write(file_name, nullptr);
}

bool ShowAll(IActionFormToolkit& toolkit, std::int32_t percent, const std::u16string& folder) {
    bool all_saved = true;
    for (const TActionFormDesign* design : AllForms()) {
        TActionForm form(*design);
        form.Load(Settings(kSettings.at(design->class_name)));
        const std::u16string file_name = folder + u"/windows-" + PictureName(*design) + u"-" +
                                         Utf16FromUtf8(std::to_string(percent)) + u".png";
        TWin32User user;
        // The window is painted when nothing else is left to do.
        int waits = 40;
        user.WhenReady(design->caption, [&waits](HWND) { return --waits == 0; });
        user.WhenReady(design->caption, [&](HWND window) {
            all_saved = SavePicture(window, file_name) && all_saved;
            return true;
        });
        user.Press(*design, u"btnCancel");
        std::u16string reason;
        if (!toolkit.ShowModal(form, {percent, nullptr}, reason)) {
            std::cerr << Utf8FromUtf16(reason) << '\n';
            return false;
        }
    }
    return all_saved;
}

int Main(int count, char** arguments) {
    std::u16string reason;
    IActionFormToolkit* const toolkit = FormToolkitProvider()(reason);
    if (count != 3 || toolkit == nullptr) {
        std::cerr << "win32_gallery PERCENT FOLDER\n";
        return 2;
    }
    return ShowAll(*toolkit, std::atoi(arguments[1]), Utf16FromUtf8(arguments[2])) ? 0 : 1;
}

}  // namespace
}  // namespace zm::test

int main(int count, char** arguments) {
    return zm::test::Main(count, arguments);
}
