#include <mutex>

#include "actions/views/gtk/uGtkModule.h"
#include "actions/views/uFormToolkit.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/module.h"

/// Part of the plug-in: finds the module with the dialogs when the first one is asked for.
namespace zm {
namespace {

// GTK cannot be unloaded: its types and main context stay. The module therefore stays loaded for
// the whole process, also when a host unloads the plug-in.
platform::TLibrary* dialog_module = nullptr;
std::mutex dialog_module_lock;

TGtkFormToolkit FindEntry(std::u16string& reason) {
    const std::lock_guard guard(dialog_module_lock);
    if (dialog_module == nullptr) {
        const std::u16string folder =
            FileFolder(platform::ModulePathOf(reinterpret_cast<const void*>(&FindEntry)));
        std::string error_text;
        dialog_module = platform::LoadLibraryFile(folder + kGtkModuleName, error_text).release();
        if (dialog_module == nullptr) {
            reason = u"the module with the dialogs cannot be loaded: " + Utf16FromUtf8(error_text);
            return nullptr;
        }
    }
    const auto entry =
        reinterpret_cast<TGtkFormToolkit>(dialog_module->FindSymbol(kGtkFormToolkitName));
    if (entry == nullptr) {
        reason = std::u16string(kGtkModuleName) + u" has no entry for the dialogs.";
    }
    return entry;
}

IActionFormToolkit* FindToolkit(std::u16string& reason) {
    const TGtkFormToolkit entry = FindEntry(reason);
    return entry == nullptr ? nullptr : entry(reason);
}

}  // namespace

TFormToolkitProvider FormToolkitProvider() {
    return &FindToolkit;
}

}  // namespace zm
