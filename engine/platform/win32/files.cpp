#include "engine/platform/files.h"

#include <windows.h>

#include <aclapi.h>

#include <algorithm>
#include <array>
#include <random>
#include <vector>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/win32/support_p.h"

namespace zm::platform {
namespace {

constexpr std::size_t kLongNameLength = 240;  // leaves room for the system's own additions
constexpr DWORD kKeptAttributes =
    FILE_ATTRIBUTE_HIDDEN | FILE_ATTRIBUTE_SYSTEM | FILE_ATTRIBUTE_NOT_CONTENT_INDEXED;
constexpr int kMaxNameAttempts = 100;
constexpr std::int64_t kUnixEpochTicks = 116'444'736'000'000'000;  // 1601 to 1970, in 100 ns

class TWin32File : public TFileHandle {
public:
    TWin32File(HANDLE handle, bool seekable) : handle_(handle), seekable_(seekable) {}
    std::int32_t Read(void* buffer, std::int32_t count) override;
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    std::int64_t GetSize() override;
    bool Close() override { return handle_.Close(); }

private:
    THandle handle_;
    bool seekable_;
    std::int64_t position_ = 0;  // unless seekable
};

std::int32_t TWin32File::Read(void* buffer, std::int32_t count) {
    auto* target = static_cast<std::uint8_t*>(buffer);
    std::int32_t moved = 0;
    while (moved < count) {
        DWORD got = 0;
        if (ReadFile(handle_.Get(), target + moved, static_cast<DWORD>(count - moved), &got,
                     nullptr) == FALSE) {
            return moved > 0 ? moved : -1;
        }
        if (got == 0) {
            break;
        }
        moved += static_cast<std::int32_t>(got);
    }
    position_ += moved;
    return moved;
}

std::int32_t TWin32File::Write(const void* buffer, std::int32_t count) {
    const auto* source = static_cast<const std::uint8_t*>(buffer);
    std::int32_t moved = 0;
    while (moved < count) {
        DWORD gone = 0;
        if (WriteFile(handle_.Get(), source + moved, static_cast<DWORD>(count - moved), &gone,
                      nullptr) == FALSE ||
            gone == 0) {
            if (moved == 0) {
                return -1;
            }
            break;
        }
        moved += static_cast<std::int32_t>(gone);
    }
    position_ += moved;
    return moved;
}

std::int64_t TWin32File::Seek(std::int64_t offset, TSeekOrigin origin) {
    std::int64_t base = 0;
    LARGE_INTEGER now{};
    if (origin == soEnd) {
        base = GetSize();
    } else if (origin == soCurrent && !seekable_) {
        base = position_;
    } else if (origin == soCurrent) {
        base = SetFilePointerEx(handle_.Get(), {}, &now, FILE_CURRENT) ? now.QuadPart : -1;
    }
    std::int64_t target = 0;
    if (base < 0 || __builtin_add_overflow(base, offset, &target)) {
        return -1;
    }
    LARGE_INTEGER wanted{};
    wanted.QuadPart = std::max<std::int64_t>(target, 0);
    if (!seekable_) {
        return wanted.QuadPart == position_ ? position_ : -1;
    }
    return SetFilePointerEx(handle_.Get(), wanted, &now, FILE_BEGIN) ? now.QuadPart : -1;
}

std::int64_t TWin32File::GetSize() {
    LARGE_INTEGER size{};
    if (!seekable_) {
        return position_;
    }
    return GetFileSizeEx(handle_.Get(), &size) ? size.QuadPart : -1;
}

std::unique_ptr<TFileHandle> Fail(DWORD error_code, std::string& error_text) {
    error_text = ErrorText(error_code);
    return nullptr;
}

DWORD AttributesOf(const std::u16string& name) {
    return HasEmbeddedZero(name) ? INVALID_FILE_ATTRIBUTES
                                 : GetFileAttributesW(WideOf(NativeName(name)));
}

/// What the system says of a name that it does not open as a plain file; 0 otherwise.
DWORD RefusalOf(const std::u16string& name) {
    if (HasEmbeddedZero(name)) {
        return ERROR_INVALID_NAME;
    }
    const DWORD attributes = AttributesOf(name);
    const bool is_folder =
        attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY) != 0;
    return is_folder ? ERROR_ACCESS_DENIED : 0;
}

/// Whether the last part of a name is one of the system's devices, such as NUL.
bool IsDeviceName(const std::u16string& name) {
    std::array<wchar_t, 64> path{};
    const DWORD length =
        GetFullPathNameW(WideOf(name), static_cast<DWORD>(path.size()), path.data(), nullptr);
    return length > 4 && length < path.size() && FromWide(path.data(), 4) == u"\\\\.\\";
}

std::u16string RandomName() {
    static constexpr char16_t kDigits[] = u"abcdefghijklmnopqrstuvwxyz234567";
    std::random_device device;
    std::u16string name = u"zm-";
    for (int i = 0; i < 12; ++i) {
        name += kDigits[device() % 32];
    }
    return name + u".tmp";
}

std::int64_t NanosecondsOf(const FILETIME& time) {
    const std::uint64_t ticks = (std::uint64_t{time.dwHighDateTime} << 32) | time.dwLowDateTime;
    return (static_cast<std::int64_t>(ticks) - kUnixEpochTicks) * 100;
}

FILETIME TimeOf(std::int64_t nanoseconds) {
    const std::int64_t rest = nanoseconds % 100;
    const std::int64_t ticks = nanoseconds / 100 - (rest < 0 ? 1 : 0) + kUnixEpochTicks;
    return {static_cast<DWORD>(ticks), static_cast<DWORD>(ticks >> 32)};
}

/// Gives a file the access rights of another. File systems without rights refuse, and there is
/// nothing to keep on them.
void CopyAccessRights(const std::u16string& from, const std::u16string& to) {
    PACL rights = nullptr;
    PSECURITY_DESCRIPTOR descriptor = nullptr;
    if (GetNamedSecurityInfoW(WideOf(from), SE_FILE_OBJECT, DACL_SECURITY_INFORMATION, nullptr,
                              nullptr, &rights, nullptr, &descriptor) != ERROR_SUCCESS) {
        return;
    }
    SECURITY_DESCRIPTOR_CONTROL control = 0;
    DWORD revision = 0;
    GetSecurityDescriptorControl(descriptor, &control, &revision);
    const DWORD inheritance = (control & SE_DACL_PROTECTED) != 0
                                  ? PROTECTED_DACL_SECURITY_INFORMATION
                                  : UNPROTECTED_DACL_SECURITY_INFORMATION;
    std::u16string target = to;  // the call takes a changeable text
    SetNamedSecurityInfoW(reinterpret_cast<wchar_t*>(target.data()), SE_FILE_OBJECT,
                          DACL_SECURITY_INFORMATION | inheritance, nullptr, nullptr, rights,
                          nullptr);
    LocalFree(descriptor);
}

std::u16string FullName(const std::u16string& name) {
    const DWORD length = GetFullPathNameW(WideOf(name), 0, nullptr, nullptr);
    std::vector<wchar_t> path(length + 1u);
    const DWORD written = GetFullPathNameW(WideOf(name), length, path.data(), nullptr);
    return written > 0 && written < length ? FromWide(path.data(), written) : name;
}

}  // namespace

std::u16string NativeName(const std::u16string& name) {
    const bool is_lifted = name.rfind(u"\\\\?\\", 0) == 0 || name.rfind(u"\\\\.\\", 0) == 0;
    if (name.size() < kLongNameLength || is_lifted) {
        return name;
    }
    const std::u16string full = FullName(name);
    return full.rfind(u"\\\\", 0) == 0 ? u"\\\\?\\UNC" + full.substr(1) : u"\\\\?\\" + full;
}

std::string ErrorText(DWORD error_code) {
    wchar_t* text = nullptr;
    const DWORD length = FormatMessageW(
        FORMAT_MESSAGE_ALLOCATE_BUFFER | FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS,
        nullptr, error_code, 0, reinterpret_cast<wchar_t*>(&text), 0, nullptr);
    std::u16string message = length > 0 ? FromWide(text, length) : std::u16string();
    LocalFree(text);
    while (!message.empty() && message.back() <= u' ') {
        message.pop_back();
    }
    return message.empty() ? "System error " + std::to_string(error_code) : Utf8FromUtf16(message);
}

std::unique_ptr<TFileHandle> OpenFile(const std::u16string& name, TFileMode mode,
                                      std::string& error_text) {
    if (const DWORD refusal = RefusalOf(name)) {
        return Fail(refusal, error_text);
    }
    const DWORD access = mode == fmOpenRead ? GENERIC_READ : GENERIC_READ | GENERIC_WRITE;
    const DWORD share = mode == fmOpenRead ? FILE_SHARE_READ : 0;
    const DWORD disposition = mode == fmCreate ? CREATE_ALWAYS : OPEN_EXISTING;
    const HANDLE handle = CreateFileW(WideOf(NativeName(name)), access, share, nullptr, disposition,
                                      FILE_ATTRIBUTE_NORMAL, nullptr);
    if (handle == INVALID_HANDLE_VALUE) {
        return Fail(GetLastError(), error_text);
    }
    return std::make_unique<TWin32File>(handle, GetFileType(handle) == FILE_TYPE_DISK);
}

std::unique_ptr<TFileHandle> CreateTemporaryBeside(const std::u16string& target_name,
                                                   std::u16string& temporary_name,
                                                   std::string& error_text) {
    if (const DWORD refusal = RefusalOf(target_name)) {
        return Fail(refusal, error_text);
    }
    const DWORD attributes = AttributesOf(target_name);
    if (attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_READONLY) != 0) {
        return Fail(ERROR_ACCESS_DENIED, error_text);
    }
    for (int attempt = 0; attempt < kMaxNameAttempts; ++attempt) {
        const std::u16string name = FileFolder(target_name) + RandomName();
        const HANDLE handle = CreateFileW(WideOf(NativeName(name)), GENERIC_READ | GENERIC_WRITE, 0,
                                          nullptr, CREATE_NEW, FILE_ATTRIBUTE_NORMAL, nullptr);
        if (handle != INVALID_HANDLE_VALUE) {
            temporary_name = name;
            return std::make_unique<TWin32File>(handle, /*seekable=*/true);
        }
        if (GetLastError() != ERROR_FILE_EXISTS) {
            break;
        }
    }
    return Fail(GetLastError(), error_text);
}

std::unique_ptr<TFileHandle> CreateDeletingFile(const std::u16string& name,
                                                std::string& error_text) {
    if (const DWORD refusal = RefusalOf(name)) {
        return Fail(refusal, error_text);
    }
    if (GetFileKind(name) == fkOther) {
        return Fail(ERROR_INVALID_NAME, error_text);
    }
    const HANDLE handle =
        CreateFileW(WideOf(NativeName(name)), GENERIC_READ | GENERIC_WRITE | DELETE,
                    FILE_SHARE_READ | FILE_SHARE_DELETE, nullptr, CREATE_ALWAYS,
                    FILE_ATTRIBUTE_TEMPORARY | FILE_FLAG_DELETE_ON_CLOSE, nullptr);
    if (handle == INVALID_HANDLE_VALUE) {
        return Fail(GetLastError(), error_text);
    }
    return std::make_unique<TWin32File>(handle, /*seekable=*/true);
}

std::u16string ResolveLinkTarget(const std::u16string& target_name) {
    const DWORD attributes = AttributesOf(target_name);
    if (attributes == INVALID_FILE_ATTRIBUTES || (attributes & FILE_ATTRIBUTE_REPARSE_POINT) == 0) {
        return target_name;
    }
    const THandle file(CreateFileW(WideOf(NativeName(target_name)), 0,
                                   FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                                   OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr));
    std::vector<wchar_t> path(32768);
    const DWORD length =
        file.IsValid()
            ? GetFinalPathNameByHandleW(file.Get(), path.data(), static_cast<DWORD>(path.size()), 0)
            : 0;
    return length > 0 && length < path.size() ? FromWide(path.data(), length) : target_name;
}

bool ReplaceFileAtomically(const std::u16string& temporary_name,
                           const std::u16string& target_name) {
    const std::u16string temporary = NativeName(temporary_name);
    const std::u16string target = NativeName(target_name);
    // Not ReplaceFileW: it works in several steps and can leave files of its own behind.
    const DWORD attributes = AttributesOf(target_name);
    if (attributes != INVALID_FILE_ATTRIBUTES) {
        CopyAccessRights(target, temporary);
        SetFileAttributesW(WideOf(temporary),
                           (attributes & kKeptAttributes) | FILE_ATTRIBUTE_ARCHIVE);
    }
    return MoveFileExW(WideOf(temporary), WideOf(target), MOVEFILE_REPLACE_EXISTING) != FALSE;
}

TFileKind GetFileKind(const std::u16string& name) {
    if (HasEmbeddedZero(name) || name.empty()) {
        return fkNone;
    }
    if (IsDeviceName(name)) {
        return fkOther;
    }
    const DWORD attributes = AttributesOf(name);
    if (attributes == INVALID_FILE_ATTRIBUTES) {
        return fkNone;
    }
    return (attributes & FILE_ATTRIBUTE_DIRECTORY) != 0 ? fkFolder : fkRegular;
}

bool IsPathSeparator(char16_t character) {
    return character == u'\\' || character == u'/' || character == u':';
}

bool FileExists(const std::u16string& name) {
    const TFileKind kind = GetFileKind(name);
    return kind == fkRegular || kind == fkOther;
}

bool FolderExists(const std::u16string& name) {
    return GetFileKind(name) == fkFolder;
}

bool RemoveFile(const std::u16string& name) {
    return !HasEmbeddedZero(name) && DeleteFileW(WideOf(NativeName(name))) != FALSE;
}

bool CreateFolder(const std::u16string& name) {
    if (HasEmbeddedZero(name) || name.empty()) {
        return false;
    }
    const std::u16string full = FullName(name);
    for (std::size_t i = 1; i <= full.size(); ++i) {
        if (i == full.size() || full[i] == u'\\') {
            CreateDirectoryW(WideOf(NativeName(full.substr(0, i))), nullptr);
        }
    }
    return FolderExists(name);
}

std::u16string AbsolutePath(const std::u16string& name) {
    return HasEmbeddedZero(name) || name.empty() ? name : FullName(name);
}

std::u16string TemporaryFolder() {
    std::array<wchar_t, MAX_PATH + 2> folder{};
    const DWORD length = GetTempPathW(static_cast<DWORD>(folder.size()), folder.data());
    return length > 0 && length < folder.size() ? FromWide(folder.data(), length) : u".\\";
}

std::optional<TFileTimes> GetFileTimes(const std::u16string& name) {
    WIN32_FILE_ATTRIBUTE_DATA data{};
    if (HasEmbeddedZero(name) ||
        GetFileAttributesExW(WideOf(NativeName(name)), GetFileExInfoStandard, &data) == FALSE) {
        return std::nullopt;
    }
    return TFileTimes{NanosecondsOf(data.ftCreationTime), NanosecondsOf(data.ftLastWriteTime),
                      NanosecondsOf(data.ftLastAccessTime)};
}

bool SetFileTimes(const std::u16string& name, const TFileTimes& times) {
    if (HasEmbeddedZero(name)) {
        return false;
    }
    const THandle file(CreateFileW(WideOf(NativeName(name)), FILE_WRITE_ATTRIBUTES,
                                   FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr,
                                   OPEN_EXISTING, FILE_FLAG_BACKUP_SEMANTICS, nullptr));
    const FILETIME created = TimeOf(times.created_ns);
    const FILETIME accessed = TimeOf(times.accessed_ns);
    const FILETIME modified = TimeOf(times.modified_ns);
    return file.IsValid() && SetFileTime(file.Get(), &created, &accessed, &modified) != FALSE;
}

}  // namespace zm::platform
