#include "engine/platform/module.h"

#include <dlfcn.h>
#include <link.h>

#include <filesystem>
#include <system_error>

#include "engine/platform/files.h"
#include "engine/platform/linux/support_p.h"

namespace zm::platform {
namespace {

class TLinuxLibrary : public TLibrary {
public:
    explicit TLinuxLibrary(void* handle) : handle_(handle) {}
    ~TLinuxLibrary() override { ::dlclose(handle_); }
    void* FindSymbol(const char* name) override { return ::dlsym(handle_, name); }

private:
    void* handle_;
};

std::unique_ptr<TLibrary> OpenLibrary(const std::string& name, std::string& error_text) {
    void* const handle = ::dlopen(name.c_str(), RTLD_NOW | RTLD_LOCAL);
    if (handle == nullptr) {
        const char* const reason = ::dlerror();
        error_text = reason != nullptr ? reason : "unknown reason";
        return nullptr;
    }
    return std::make_unique<TLinuxLibrary>(handle);
}

}  // namespace

std::u16string ModulePathOf(const void* address) {
    Dl_info info{};
    void* extra = nullptr;
    if (::dladdr1(address, &info, &extra, RTLD_DL_LINKMAP) == 0 || extra == nullptr) {
        return {};
    }
    const auto* const map = static_cast<const link_map*>(extra);
    if (map->l_name == nullptr || *map->l_name == '\0') {
        return ProgramPath();  // the program itself has an empty name in this list
    }
    std::error_code error;
    const auto path = std::filesystem::canonical(map->l_name, error);
    return Utf16FromUtf8(error ? std::string(map->l_name) : path.native());
}

std::u16string ProgramPath() {
    std::error_code error;
    const auto path = std::filesystem::read_symlink("/proc/self/exe", error);
    return error ? std::u16string() : Utf16FromUtf8(path.native());
}

std::unique_ptr<TLibrary> LoadLibraryFile(const std::u16string& path, std::string& error_text) {
    // An absolute path, because a bare name would be looked for in the system's folders.
    return OpenLibrary(NativeName(AbsolutePath(path)), error_text);
}

std::unique_ptr<TLibrary> LoadInstalledLibrary(const std::string& file_name,
                                               std::string& error_text) {
    if (file_name.find('/') != std::string::npos) {
        error_text = "not a bare file name";
        return nullptr;
    }
    return OpenLibrary(file_name, error_text);
}

}  // namespace zm::platform
