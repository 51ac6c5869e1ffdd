// A temporary file without a name: it is unlinked as soon as it is open, so that nothing of it
// outlives the process.
#include "engine/platform/tempmapping.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>

#include "engine/platform/files.h"
#include "engine/platform/linux/support_p.h"

namespace zm::platform {
namespace {

class TLinuxMapping : public TTemporaryMapping {
public:
    explicit TLinuxMapping(int descriptor) : descriptor_(descriptor) {}
    ~TLinuxMapping() override { ::close(descriptor_); }
    bool Resize(std::int64_t size_bytes) override;
    void* MapWindow(std::int64_t position, std::size_t size_bytes) override;
    void UnmapWindow(void* window, std::size_t size_bytes) override;

private:
    int descriptor_;
};

bool TLinuxMapping::Resize(std::int64_t size_bytes) {
    struct stat info {};
    if (size_bytes < 1 || ::fstat(descriptor_, &info) != 0) {
        return false;
    }
    TWriteSignalGuard guard;
    int result = 0;
    if (size_bytes > info.st_size) {
        do {
            result = ::posix_fallocate(descriptor_, info.st_size, size_bytes - info.st_size);
        } while (result == EINTR);
        if (result == 0) {
            return true;
        }
        guard.Consume();
        size_bytes = info.st_size;  // gives back what was reserved
    }
    const int cut = RetryInterrupted([&] { return ::ftruncate(descriptor_, size_bytes); });
    return result == 0 && cut == 0;
}

void* TLinuxMapping::MapWindow(std::int64_t position, std::size_t size_bytes) {
    void* const window =
        ::mmap(nullptr, size_bytes, PROT_READ | PROT_WRITE, MAP_SHARED, descriptor_, position);
    return window == MAP_FAILED ? nullptr : window;
}

void TLinuxMapping::UnmapWindow(void* window, std::size_t size_bytes) {
    ::munmap(window, size_bytes);
}

/// Only characters that are safe in a name; the text serves whoever lists open files.
std::string NamePart(const std::string& descriptor) {
    std::string part;
    for (const char c : descriptor.substr(0, 32)) {
        const bool plain = (c >= '0' && c <= '9') || (c >= 'A' && c <= 'Z') ||
                           (c >= 'a' && c <= 'z') || c == '-' || c == '_';
        part += plain ? c : '_';
    }
    return part;
}

}  // namespace

std::unique_ptr<TTemporaryMapping> CreateTemporaryMapping(const std::u16string& folder,
                                                          const std::string& descriptor,
                                                          std::int64_t size_bytes) {
    std::string name = NativeName(folder.empty() ? TemporaryFolder() : folder);
    if (!name.empty() && name.back() != '/') {
        name += '/';
    }
    name += "zm-" + NamePart(descriptor) + "-XXXXXX";
    const int file = RetryInterrupted([&] { return ::mkostemp(name.data(), O_CLOEXEC); });
    if (file < 0) {
        return nullptr;
    }
    ::unlink(name.c_str());
    auto mapping = std::make_unique<TLinuxMapping>(file);
    if (!mapping->Resize(size_bytes)) {
        return nullptr;
    }
    return mapping;
}

std::size_t WindowAlignment() {
    static const auto page_bytes = static_cast<std::size_t>(::sysconf(_SC_PAGESIZE));
    return page_bytes;
}

}  // namespace zm::platform
