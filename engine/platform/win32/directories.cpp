#include "engine/platform/directories.h"

#include <windows.h>

#include <cwchar>

#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

constexpr std::int64_t kUnixEpochTicks = 116'444'736'000'000'000;  // 1601 to 1970, in 100 ns

std::int64_t NanosecondsOf(const FILETIME& time) {
    const std::uint64_t ticks = (std::uint64_t{time.dwHighDateTime} << 32) | time.dwLowDateTime;
    return (static_cast<std::int64_t>(ticks) - kUnixEpochTicks) * 100;
}

class TWin32Directory : public TDirectoryReader {
public:
    TWin32Directory(HANDLE search, const WIN32_FIND_DATAW& first) : search_(search), data_(first) {}
    ~TWin32Directory() override { FindClose(search_); }
    TWin32Directory(const TWin32Directory&) = delete;
    TWin32Directory& operator=(const TWin32Directory&) = delete;
    bool Next(TDirectoryEntry& entry) override;

private:
    bool Advance();

    HANDLE search_;
    WIN32_FIND_DATAW data_;
    bool first_pending_ = true;  // the search begins with its first entry in hand
};

bool TWin32Directory::Advance() {
    if (first_pending_) {
        first_pending_ = false;
        return true;
    }
    return FindNextFileW(search_, &data_) != FALSE;
}

bool TWin32Directory::Next(TDirectoryEntry& entry) {
    do {
        if (!Advance()) {
            return false;
        }
        entry.name = FromWide(data_.cFileName, std::wcslen(data_.cFileName));
    } while (entry.name == u"." || entry.name == u"..");
    entry.is_folder = (data_.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
    entry.is_hidden = (data_.dwFileAttributes & FILE_ATTRIBUTE_HIDDEN) != 0;
    const std::uint64_t size = (std::uint64_t{data_.nFileSizeHigh} << 32) | data_.nFileSizeLow;
    entry.size_bytes = entry.is_folder ? 0 : static_cast<std::int64_t>(size);
    entry.times = {NanosecondsOf(data_.ftCreationTime), NanosecondsOf(data_.ftLastWriteTime),
                   NanosecondsOf(data_.ftLastAccessTime)};
    return true;
}

/// A pattern for all entries of a folder.
std::u16string AllOf(const std::u16string& folder) {
    const bool joined = folder.empty() || IsPathSeparator(folder.back());
    return folder + (joined ? u"*" : u"\\*");
}

}  // namespace

std::unique_ptr<TDirectoryReader> OpenDirectory(const std::u16string& folder) {
    if (HasEmbeddedZero(folder)) {
        return nullptr;
    }
    WIN32_FIND_DATAW first{};
    const HANDLE search = FindFirstFileW(WideOf(NativeName(AllOf(folder))), &first);
    if (search == INVALID_HANDLE_VALUE) {
        return nullptr;
    }
    return std::make_unique<TWin32Directory>(search, first);
}

}  // namespace zm::platform
