// A temporary file that the system deletes with its last handle, and views of its mapping object.
// The object's size is the file's, so each change of size makes a new one.
#include "engine/platform/tempmapping.h"

#include <windows.h>

#include <algorithm>
#include <random>

#include "engine/platform/files.h"
#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

constexpr int kMaxNameAttempts = 100;

class TWin32Mapping : public TTemporaryMapping {
public:
    explicit TWin32Mapping(HANDLE file) : file_(file) {}
    ~TWin32Mapping() override { CloseMapping(); }
    bool Resize(std::int64_t size_bytes) override;
    void* MapWindow(std::int64_t position, std::size_t size_bytes) override;
    void UnmapWindow(void* window, std::size_t) override { UnmapViewOfFile(window); }

private:
    bool SetFileSize(std::int64_t size_bytes);
    void CloseMapping();

    THandle file_;
    HANDLE mapping_ = nullptr;
};

void TWin32Mapping::CloseMapping() {
    if (mapping_ != nullptr) {
        CloseHandle(mapping_);
        mapping_ = nullptr;
    }
}

bool TWin32Mapping::SetFileSize(std::int64_t size_bytes) {
    LARGE_INTEGER end{};
    end.QuadPart = size_bytes;
    return SetFilePointerEx(file_.Get(), end, nullptr, FILE_BEGIN) != FALSE &&
           SetEndOfFile(file_.Get()) != FALSE;
}

bool TWin32Mapping::Resize(std::int64_t size_bytes) {
    LARGE_INTEGER before{};
    if (size_bytes < 1 || GetFileSizeEx(file_.Get(), &before) == FALSE) {
        return false;
    }
    CloseMapping();  // the system cuts no file that has one
    bool changed = SetFileSize(size_bytes);
    if (!changed) {
        size_bytes = before.QuadPart;
        SetFileSize(size_bytes);
    }
    if (size_bytes > 0) {
        mapping_ = CreateFileMappingW(file_.Get(), nullptr, PAGE_READWRITE, 0, 0, nullptr);
    }
    return changed && mapping_ != nullptr;
}

void* TWin32Mapping::MapWindow(std::int64_t position, std::size_t size_bytes) {
    const auto start = static_cast<std::uint64_t>(position);
    return mapping_ == nullptr ? nullptr
                               : MapViewOfFile(mapping_, FILE_MAP_READ | FILE_MAP_WRITE,
                                               static_cast<DWORD>(start >> 32),
                                               static_cast<DWORD>(start), size_bytes);
}

std::u16string UniqueName(const std::string& descriptor) {
    std::random_device device;
    std::u16string name = u"zm-";
    for (const char c : descriptor.substr(0, 32)) {
        const bool plain = (c >= '0' && c <= '9') || (c >= 'A' && c <= 'Z') ||
                           (c >= 'a' && c <= 'z') || c == '-' || c == '_';
        name += plain ? static_cast<char16_t>(c) : u'_';
    }
    name += u'-';
    for (int i = 0; i < 12; ++i) {
        name += static_cast<char16_t>(u'a' + device() % 26);
    }
    return name + u".tmp";
}

HANDLE CreateHiddenFile(const std::u16string& folder, const std::string& descriptor) {
    HANDLE file = INVALID_HANDLE_VALUE;
    for (int attempt = 0; attempt < kMaxNameAttempts && file == INVALID_HANDLE_VALUE; ++attempt) {
        file = CreateFileW(WideOf(NativeName(folder + UniqueName(descriptor))),
                           GENERIC_READ | GENERIC_WRITE | DELETE, 0, nullptr, CREATE_NEW,
                           FILE_ATTRIBUTE_TEMPORARY | FILE_FLAG_DELETE_ON_CLOSE, nullptr);
        if (GetLastError() != ERROR_FILE_EXISTS) {
            break;
        }
    }
    return file;
}

}  // namespace

std::unique_ptr<TTemporaryMapping> CreateTemporaryMapping(const std::u16string& folder,
                                                          const std::string& descriptor,
                                                          std::int64_t size_bytes) {
    std::u16string place = folder.empty() ? TemporaryFolder() : folder;
    if (!IsPathSeparator(place.back())) {
        place += u'\\';
    }
    const HANDLE file = CreateHiddenFile(place, descriptor);
    if (file == INVALID_HANDLE_VALUE) {
        return nullptr;
    }
    auto mapping = std::make_unique<TWin32Mapping>(file);
    if (!mapping->Resize(size_bytes)) {
        return nullptr;
    }
    return mapping;
}

std::size_t WindowAlignment() {
    SYSTEM_INFO info{};
    GetSystemInfo(&info);
    return info.dwAllocationGranularity;
}

}  // namespace zm::platform
