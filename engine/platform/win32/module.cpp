#include "engine/platform/module.h"

#include <windows.h>

#include <vector>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/files.h"
#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

class TWin32Library : public TLibrary {
public:
    explicit TWin32Library(HMODULE module) : module_(module) {}
    ~TWin32Library() override { FreeLibrary(module_); }
    void* FindSymbol(const char* name) override {
        return reinterpret_cast<void*>(GetProcAddress(module_, name));
    }

private:
    HMODULE module_;
};

std::u16string PathOf(HMODULE module) {
    std::vector<wchar_t> path(MAX_PATH);
    while (path.size() <= 65536) {
        const DWORD length =
            GetModuleFileNameW(module, path.data(), static_cast<DWORD>(path.size()));
        if (length < path.size()) {
            return FromWide(path.data(), length);
        }
        path.resize(path.size() * 2);
    }
    return {};
}

}  // namespace

std::u16string ModulePathOf(const void* address) {
    HMODULE module = nullptr;
    const DWORD flags =
        GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT;
    if (GetModuleHandleExW(flags, static_cast<const wchar_t*>(address), &module) == FALSE) {
        return {};
    }
    return PathOf(module);
}

std::u16string ProgramPath() {
    return PathOf(nullptr);
}

std::unique_ptr<TLibrary> LoadLibraryFile(const std::u16string& path, std::string& error_text) {
    // An absolute path and no search in other folders for what the library itself needs.
    const HMODULE module =
        LoadLibraryExW(WideOf(AbsolutePath(path)), nullptr, LOAD_WITH_ALTERED_SEARCH_PATH);
    if (module == nullptr) {
        error_text = ErrorText(GetLastError());
        return nullptr;
    }
    return std::make_unique<TWin32Library>(module);
}

std::unique_ptr<TLibrary> LoadInstalledLibrary(const std::string& file_name,
                                               std::string& error_text) {
    constexpr DWORD kProgramAndSystem =
        LOAD_LIBRARY_SEARCH_APPLICATION_DIR | LOAD_LIBRARY_SEARCH_SYSTEM32;
    const std::u16string name = Utf16FromUtf8(file_name);
    const bool is_bare = name.find_first_of(u"/\\:") == std::u16string::npos;
    const HMODULE module =
        is_bare ? LoadLibraryExW(WideOf(name), nullptr, kProgramAndSystem) : nullptr;
    if (module == nullptr) {
        error_text = is_bare ? ErrorText(GetLastError()) : "not a bare file name";
        return nullptr;
    }
    return std::make_unique<TWin32Library>(module);
}

}  // namespace zm::platform
