#include "engine/platform/linux/drawing_library_p.h"

#include <dlfcn.h>

#include <mutex>
#include <optional>

#include "engine/platform/drawing.h"

namespace zm::platform {
namespace {

/// One name: it brings the other libraries, and a look-up by its handle reaches them too.
constexpr char kLibraryName[] = "libpangocairo-1.0.so.0";

template <typename TFunction>
bool Bind(void* handle, const char* name, TFunction& function) {
    function = reinterpret_cast<TFunction>(::dlsym(handle, name));
    return function != nullptr;
}

std::optional<TDrawingLibrary> BindLibrary() {
    void* const handle = ::dlopen(kLibraryName, RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) {
        return std::nullopt;
    }
    TDrawingLibrary library;
    bool is_complete = true;
#define ZM_BIND_FUNCTION(name) is_complete = Bind(handle, #name, library.name) && is_complete;
    ZM_DRAWING_FUNCTIONS(ZM_BIND_FUNCTION)
#undef ZM_BIND_FUNCTION
    return is_complete ? std::optional(library) : std::nullopt;
}

/// The one binding of the process.
struct TBinding {
    std::mutex lock;
    int count = 0;
    bool is_loaded = false;
};

TBinding& Binding() {
    static TBinding binding;
    return binding;
}

}  // namespace

const TDrawingLibrary* LoadDrawingLibrary() {
    static const std::optional<TDrawingLibrary> library = BindLibrary();
    return library ? &*library : nullptr;
}

bool BindVectorGraphics(TLibraryLoading loading) {
    TBinding& binding = Binding();
    const std::scoped_lock guard(binding.lock);
    ++binding.count;
    if (loading == TLibraryLoading::kAllowed) {
        binding.is_loaded = LoadDrawingLibrary() != nullptr;
    }
    return binding.is_loaded;
}

void UnbindVectorGraphics(TUnbinding unbinding) {
    TBinding& binding = Binding();
    const std::scoped_lock guard(binding.lock);
    if (binding.count <= 0 && unbinding == TUnbinding::kCounted) {
        return;
    }
    --binding.count;
    // Only the count changes: see LoadDrawingLibrary.
}

bool IsVectorGraphicsBound() {
    TBinding& binding = Binding();
    const std::scoped_lock guard(binding.lock);
    return binding.is_loaded && binding.count > 0;
}

}  // namespace zm::platform
