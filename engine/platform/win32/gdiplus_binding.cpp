#include "engine/platform/win32/gdiplus_binding_p.h"

#include <atomic>
#include <memory>
#include <mutex>
#include <new>
#include <string>

#include "engine/platform/module.h"

namespace zm::platform {
namespace {

constexpr UINT32 kLibraryVersion = 1;
/// No error box, whatever file the search for the library meets.
constexpr DWORD kQuietErrors = 0x8000;

/// The one binding of the process, guarded by its lock. The table is published only when it is
/// whole and the library runs, so that readers need no lock.
struct TBinding {
    std::mutex lock;
    std::int32_t count = 0;
    std::unique_ptr<TLibrary> library;
    decltype(&Gdiplus::GdiplusShutdown) shutdown = nullptr;
    ULONG_PTR token = 0;
    TGdiPlusEntries entries;
    std::atomic<const TGdiPlusEntries*> published = nullptr;
};

/// Never destroyed: canvases may go while the process ends.
TBinding& Binding() {
    static TBinding* const binding = new TBinding;
    return *binding;
}

template <typename TFunction>
bool Fetch(TLibrary& library, const char* name, TFunction& function) {
    function = reinterpret_cast<TFunction>(library.FindSymbol(name));
    return function != nullptr;
}

bool FetchEntries(TLibrary& library, TGdiPlusEntries& entries) {
    bool has_all = true;
#define ZM_FETCH_ENTRY(name) has_all = Fetch(library, #name, entries.name) && has_all;
    ZM_GDIPLUS_ENTRIES(ZM_FETCH_ENTRY)
#undef ZM_FETCH_ENTRY
    return has_all;
}

std::unique_ptr<TLibrary> LoadQuietly() {
    // The mode of the thread, since other jobs load their own libraries meanwhile.
    DWORD old_mode = 0;
    const BOOL is_set = SetThreadErrorMode(kQuietErrors, &old_mode);
    std::string error_text;
    std::unique_ptr<TLibrary> library = LoadInstalledLibrary("gdiplus.dll", error_text);
    if (is_set != FALSE) {
        SetThreadErrorMode(old_mode, nullptr);
    }
    return library;
}

bool StartLibrary(TBinding& binding) {
    decltype(&Gdiplus::GdiplusStartup) startup = nullptr;
    TLibrary& library = *binding.library;
    if (!FetchEntries(library, binding.entries) || !Fetch(library, "GdiplusStartup", startup) ||
        !Fetch(library, "GdiplusShutdown", binding.shutdown)) {
        return false;
    }
    Gdiplus::GdiplusStartupInput input;
    input.GdiplusVersion = kLibraryVersion;
    return IsDone(startup(&binding.token, &input, nullptr));
}

void LoadBound(TBinding& binding) {
    binding.library = LoadQuietly();
    if (binding.library == nullptr) {
        return;
    }
    if (!StartLibrary(binding)) {
        binding.library.reset();
        return;
    }
    binding.published = &binding.entries;
}

void FreeBound(TBinding& binding) {
    binding.published = nullptr;
    binding.shutdown(binding.token);
    binding.token = 0;
    binding.library.reset();
}

/// A program's own end takes the library with it; only a library that the host may unload must
/// leave nothing behind.
bool IsLibraryImage() {
    HMODULE module = nullptr;
    const DWORD flags =
        GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT;
    const auto* inside = reinterpret_cast<const wchar_t*>(&kLibraryVersion);
    return GetModuleHandleExW(flags, inside, &module) != FALSE &&
           module != GetModuleHandleW(nullptr);
}

}  // namespace

const TGdiPlusEntries* GdiPlus() {
    return Binding().published;
}

bool BindVectorGraphics(TLibraryLoading loading) {
    TBinding& binding = Binding();
    const std::lock_guard guard(binding.lock);
    ++binding.count;
    if (binding.published == nullptr && loading == TLibraryLoading::kAllowed) {
        try {
            LoadBound(binding);
        } catch (const std::bad_alloc&) {
            binding.library.reset();
        }
    }
    return binding.published != nullptr;
}

void UnbindVectorGraphics(TUnbinding unbinding) {
    TBinding& binding = Binding();
    const std::lock_guard guard(binding.lock);
    if (binding.count <= 0 && unbinding == TUnbinding::kCounted) {
        return;
    }
    --binding.count;
    if (binding.count == 0 && binding.published != nullptr && IsLibraryImage()) {
        FreeBound(binding);
    }
}

bool IsVectorGraphicsBound() {
    return GdiPlus() != nullptr;
}

}  // namespace zm::platform
