#include "engine/foundation/zmstrings.h"
#include "engine/platform/module.h"
#include "host/qvedit.h"

namespace zm::qvrun {

IJobEditorWindow* FindEditWindow(const std::u16string& folder, std::u16string& reason) {
    std::string error_text;
    // The toolkit behind the module cannot be unloaded again, so the module isn't either.
    static platform::TLibrary* module = nullptr;
    if (module == nullptr) {
        module = platform::LoadLibraryFile(folder + kEditWindowModuleName, error_text).release();
    }
    void* const entry = module == nullptr ? nullptr : module->FindSymbol(kEditWindowEntryName);
    if (entry == nullptr) {
        reason = u"this qvrun has no window: " + Utf16FromUtf8(error_text);
        return nullptr;
    }
    return reinterpret_cast<TJobEditorWindowEntry>(entry)(reason);
}

}  // namespace zm::qvrun
