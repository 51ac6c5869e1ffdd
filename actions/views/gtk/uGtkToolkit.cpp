#include <gtk/gtk.h>

#include "actions/views/gtk/uGtkFormView_p.h"
#include "actions/views/gtk/uGtkModule.h"
#include "actions/views/gtk/uGtkStart.h"
#include "actions/views/uFormViewParts_p.h"
#include "engine/platform/callconv.h"

/// The module's entry and the toolkit behind it.
namespace zm {
namespace {

class TGtkToolkit : public IActionFormToolkit {
public:
    bool ShowModal(IActionForm& form, const TFormShowOptions& options,
                   std::u16string& reason) override;
};

bool TGtkToolkit::ShowModal(IActionForm& form, const TFormShowOptions& options,
                            std::u16string& reason) {
    if (gdk_display_get_default() == nullptr) {
        reason = u"the display has gone.";
        return false;
    }
    TGtkFormView view(form, BoundedOptions(options));
    view.Run();
    return true;
}

}  // namespace
}  // namespace zm

ZM_EXPORT zm::IActionFormToolkit* ZmGtkFormToolkit(std::u16string& reason) {
    static zm::TGtkToolkit toolkit;
    if (!zm::StartGtk()) {
        reason = u"there is no display to show it on.";
        return nullptr;
    }
    return &toolkit;
}
