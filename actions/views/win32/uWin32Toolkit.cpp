#include <windows.h>

#include <commctrl.h>

#include <exception>

#include "actions/views/uFormToolkit.h"
#include "actions/views/uFormViewParts_p.h"
#include "actions/views/win32/uWin32FormView_p.h"
#include "engine/foundation/zmstrings.h"

/// The toolkit of Windows: linked into the plug-in, its libraries loaded with the first form.
namespace zm {
namespace {

class TWin32Toolkit : public IActionFormToolkit {
public:
    bool ShowModal(IActionForm& form, const TFormShowOptions& options,
                   std::u16string& reason) override;
};

/// Brings the windows of the present common controls, tool tips among them.
void LoadCommonControls() {
    const TThemedScope themed;
    INITCOMMONCONTROLSEX classes{sizeof(INITCOMMONCONTROLSEX),
                                 ICC_STANDARD_CLASSES | ICC_WIN95_CLASSES};
    SystemFunction<decltype(&InitCommonControlsEx)>(L"comctl32.dll",
                                                    "InitCommonControlsEx")(&classes);
}

bool TWin32Toolkit::ShowModal(IActionForm& form, const TFormShowOptions& options,
                              std::u16string& reason) {
    if (!HasVisibleDesktop()) {
        reason = u"this program runs without a desktop.";
        return false;
    }
    try {
        LoadCommonControls();
    } catch (const std::exception& error) {
        reason = Utf16FromUtf8(error.what());
        return false;
    }
    TWin32FormView view(form, BoundedOptions(options));
    return view.Run(reason);
}

IActionFormToolkit* FindToolkit(std::u16string&) {
    static TWin32Toolkit toolkit;
    return &toolkit;
}

}  // namespace

TFormToolkitProvider FormToolkitProvider() {
    return &FindToolkit;
}

}  // namespace zm
