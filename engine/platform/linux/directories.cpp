#include "engine/platform/directories.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>

#include "engine/platform/linux/support_p.h"

namespace zm::platform {
namespace {

class TLinuxDirectory : public TDirectoryReader {
public:
    TLinuxDirectory(DIR* directory, std::u16string folder)
        : directory_(directory), folder_(std::move(folder)) {
        folder_ += folder_.empty() || folder_.back() == u'/' ? u"" : u"/";
    }
    ~TLinuxDirectory() override { ::closedir(directory_); }
    TLinuxDirectory(const TLinuxDirectory&) = delete;
    TLinuxDirectory& operator=(const TLinuxDirectory&) = delete;
    bool Next(TDirectoryEntry& entry) override;

private:
    bool Describe(const char* native, TDirectoryEntry& entry) const;

    DIR* directory_;
    std::u16string folder_;
};

bool TLinuxDirectory::Describe(const char* native, TDirectoryEntry& entry) const {
    struct stat info {};
    const int descriptor = ::dirfd(directory_);
    if (::fstatat(descriptor, native, &info, 0) != 0 &&
        ::fstatat(descriptor, native, &info, AT_SYMLINK_NOFOLLOW) != 0) {
        return false;
    }
    entry.name = Utf16FromUtf8(native);
    entry.is_folder = S_ISDIR(info.st_mode);
    entry.is_hidden = native[0] == '.';
    entry.size_bytes = entry.is_folder ? 0 : info.st_size;
    entry.times = GetFileTimes(folder_ + entry.name).value_or(TFileTimes{});
    return true;
}

bool TLinuxDirectory::Next(TDirectoryEntry& entry) {
    while (const dirent* const found = ::readdir(directory_)) {
        const std::string_view name = found->d_name;
        if (name != "." && name != ".." && Describe(found->d_name, entry)) {
            return true;
        }
    }
    return false;
}

}  // namespace

std::unique_ptr<TDirectoryReader> OpenDirectory(const std::u16string& folder) {
    if (folder.find(u'\0') != std::u16string::npos) {
        return nullptr;
    }
    const std::string native = folder.empty() ? "." : NativeName(folder);
    DIR* const directory = ::opendir(native.c_str());
    if (directory == nullptr) {
        return nullptr;
    }
    return std::make_unique<TLinuxDirectory>(directory, folder);
}

}  // namespace zm::platform
