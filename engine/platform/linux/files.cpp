// Files by the system's calls. Every call that a signal can interrupt is repeated; a write that
// the system refuses is an error of that write, never a signal that ends the host.
#include "engine/platform/files.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <random>
#include <system_error>

#include "engine/platform/linux/support_p.h"

namespace zm::platform {
namespace {

constexpr int kMaxLinks = 40;
constexpr int kMaxNameAttempts = 100;
constexpr mode_t kPermissionBits = 07777;

/// How far a file's position can be moved.
enum TSeekability : std::uint8_t {
    skReal,     // the system keeps the position
    skVirtual,  // a character device: any position, kept here
    skNone,     // pipe or socket: counted, not movable
};

TSeekability SeekabilityOf(mode_t mode) {
    if (S_ISREG(mode) || S_ISBLK(mode)) {
        return skReal;
    }
    return S_ISCHR(mode) ? skVirtual : skNone;
}

class TLinuxFile : public TFileHandle {
public:
    TLinuxFile(int descriptor, TSeekability seekability)
        : descriptor_(descriptor), seekability_(seekability) {}
    ~TLinuxFile() override { Close(); }
    std::int32_t Read(void* buffer, std::int32_t count) override;
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    std::int64_t GetSize() override;
    bool Close() override;

private:
    std::int64_t SeekReal(std::int64_t offset, TSeekOrigin origin);

    int descriptor_;
    TSeekability seekability_;
    std::int64_t position_ = 0;  // unless skReal
};

std::int32_t TLinuxFile::Read(void* buffer, std::int32_t count) {
    auto* target = static_cast<std::uint8_t*>(buffer);
    std::int32_t moved = 0;
    while (moved < count) {
        const auto wanted = static_cast<std::size_t>(count - moved);
        const ssize_t got =
            RetryInterrupted([&] { return ::read(descriptor_, target + moved, wanted); });
        if (got < 0) {
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

std::int32_t TLinuxFile::Write(const void* buffer, std::int32_t count) {
    const auto* source = static_cast<const std::uint8_t*>(buffer);
    TWriteSignalGuard guard;
    std::int32_t moved = 0;
    while (moved < count) {
        const auto wanted = static_cast<std::size_t>(count - moved);
        const ssize_t gone =
            RetryInterrupted([&] { return ::write(descriptor_, source + moved, wanted); });
        if (gone <= 0) {
            guard.Consume();
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

std::int64_t TLinuxFile::SeekReal(std::int64_t offset, TSeekOrigin origin) {
    std::int64_t base = 0;
    if (origin != soBeginning) {
        base = origin == soEnd ? GetSize() : ::lseek(descriptor_, 0, SEEK_CUR);
        if (base < 0) {
            return -1;
        }
    }
    std::int64_t target = 0;
    if (__builtin_add_overflow(base, offset, &target)) {
        return -1;
    }
    return ::lseek(descriptor_, std::max<std::int64_t>(target, 0), SEEK_SET);
}

std::int64_t TLinuxFile::Seek(std::int64_t offset, TSeekOrigin origin) {
    if (seekability_ == skReal) {
        return SeekReal(offset, origin);
    }
    // Required: a device or pipe has no length, so its end is the farthest byte moved so far.
    std::int64_t target = 0;
    if (__builtin_add_overflow(origin == soBeginning ? 0 : position_, offset, &target)) {
        return -1;
    }
    target = std::max<std::int64_t>(target, 0);
    if (seekability_ == skNone && target != position_) {
        return -1;
    }
    position_ = target;
    return position_;
}

std::int64_t TLinuxFile::GetSize() {
    struct stat info {};
    if (::fstat(descriptor_, &info) != 0) {
        return -1;
    }
    if (!S_ISBLK(info.st_mode)) {
        return seekability_ == skReal ? info.st_size : position_;
    }
    const off_t before = ::lseek(descriptor_, 0, SEEK_CUR);
    const off_t end = ::lseek(descriptor_, 0, SEEK_END);
    ::lseek(descriptor_, before, SEEK_SET);
    return end;
}

bool TLinuxFile::Close() {
    if (descriptor_ < 0) {
        return true;
    }
    const int result = ::close(descriptor_);
    descriptor_ = -1;
    return result == 0 || errno == EINTR;  // the descriptor is gone in either case
}

/// A file that is removed when its handle closes.
class TDeletingFile : public TFileHandle {
public:
    // The absolute name is kept: the current folder may be another one at the end.
    TDeletingFile(std::unique_ptr<TFileHandle> file, const std::u16string& name)
        : file_(std::move(file)), name_(AbsolutePath(name)) {}
    ~TDeletingFile() override { Close(); }
    std::int32_t Read(void* buffer, std::int32_t count) override {
        return file_->Read(buffer, count);
    }
    std::int32_t Write(const void* buffer, std::int32_t count) override {
        return file_->Write(buffer, count);
    }
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override {
        return file_->Seek(offset, origin);
    }
    std::int64_t GetSize() override { return file_->GetSize(); }
    bool Close() override {
        const bool closed = file_->Close();
        if (!name_.empty()) {
            RemoveFile(name_);
            name_.clear();
        }
        return closed;
    }

private:
    std::unique_ptr<TFileHandle> file_;
    std::u16string name_;
};

std::unique_ptr<TFileHandle> Fail(int error_number, std::string& error_text) {
    error_text = ErrorText(error_number);
    return nullptr;
}

bool HasEmbeddedZero(std::u16string_view name) {
    return name.find(u'\0') != std::u16string_view::npos;
}

int OpenFlags(TFileMode mode, mode_t existing_mode) {
    // Without O_NONBLOCK the opening of a pipe would wait for its other end, perhaps for ever.
    const int common = O_CLOEXEC | O_NONBLOCK | O_NOCTTY;
    switch (mode) {
        case fmOpenRead: return common | O_RDONLY;
        case fmOpenReadWrite: return common | O_RDWR;
        case fmCreate: break;
    }
    const bool plain = existing_mode == 0 || S_ISREG(existing_mode) || S_ISDIR(existing_mode);
    return plain ? common | O_RDWR | O_CREAT | O_TRUNC : common | O_WRONLY;
}

void MakeBlocking(int descriptor) {
    const int flags = ::fcntl(descriptor, F_GETFL);
    if (flags >= 0) {
        ::fcntl(descriptor, F_SETFL, flags & ~O_NONBLOCK);
    }
}

/// Error number of a file that was opened but is of no use, or 0.
int UnfitKind(mode_t mode, TFileMode wanted) {
    if (S_ISDIR(mode)) {
        return EISDIR;
    }
    return wanted != fmCreate && SeekabilityOf(mode) == skNone ? ESPIPE : 0;
}

std::string RandomName() {
    static constexpr char kDigits[] = "abcdefghijklmnopqrstuvwxyz234567";
    std::random_device device;
    std::string name = ".zm-";
    for (int i = 0; i < 12; ++i) {
        name += kDigits[device() % 32];
    }
    return name + ".tmp";
}

std::u16string FromNative(const std::string& name) {
    return Utf16FromUtf8(name);
}

std::string LinkContents(const std::string& name) {
    std::array<char, PATH_MAX> buffer{};
    const ssize_t length = ::readlink(name.c_str(), buffer.data(), buffer.size());
    return length <= 0 || static_cast<std::size_t>(length) >= buffer.size()
               ? std::string()
               : std::string(buffer.data(), static_cast<std::size_t>(length));
}

std::string FolderOf(const std::string& name) {
    const auto slash = name.rfind('/');
    return slash == std::string::npos ? std::string() : name.substr(0, slash + 1);
}

/// Mode for the new file that will take the target's place; -1 with errno set when the target
/// must not be replaced.
int ModeOfReplacement(const std::string& target) {
    struct stat info {};
    if (::stat(target.c_str(), &info) != 0) {
        return errno == ENOENT ? 0666 : -1;
    }
    if (S_ISDIR(info.st_mode)) {
        errno = EISDIR;
        return -1;
    }
    if (::faccessat(AT_FDCWD, target.c_str(), W_OK, AT_EACCESS) != 0) {
        return -1;
    }
    return static_cast<int>((info.st_mode & 0777) | S_IRUSR | S_IWUSR);
}

/// Gives the new file the owner and permissions of the one it replaces. An owner that this
/// process may not set stays its own, as with a file written anew.
bool TakeOverPermissions(const std::string& temporary, const struct stat& target) {
    struct stat own {};
    if (::stat(temporary.c_str(), &own) != 0) {
        return false;
    }
    mode_t mode = target.st_mode & kPermissionBits;
    const bool same_owner = own.st_uid == target.st_uid && own.st_gid == target.st_gid;
    if (!same_owner && ::chown(temporary.c_str(), target.st_uid, target.st_gid) != 0) {
        mode &= 0777;  // set-id bits would now speak of another owner
    }
    return ::chmod(temporary.c_str(), mode) == 0;
}

std::int64_t NanosecondsOf(const timespec& time) {
    return static_cast<std::int64_t>(time.tv_sec) * 1'000'000'000 + time.tv_nsec;
}

timespec TimeOf(std::int64_t nanoseconds) {
    timespec time{};
    time.tv_sec = nanoseconds / 1'000'000'000;
    time.tv_nsec = nanoseconds % 1'000'000'000;
    if (time.tv_nsec < 0) {
        time.tv_nsec += 1'000'000'000;
        --time.tv_sec;
    }
    return time;
}

}  // namespace

std::string ErrorText(int error_number) {
    std::array<char, 256> buffer{};
    return ::strerror_r(error_number, buffer.data(), buffer.size());
}

TWriteSignalGuard::TWriteSignalGuard() {
    sigset_t pending{};
    ::sigpending(&pending);
    ::sigemptyset(&guarded_);
    for (const int signal_number : {SIGPIPE, SIGXFSZ}) {
        if (::sigismember(&pending, signal_number) == 0) {  // one that waits already is not ours
            ::sigaddset(&guarded_, signal_number);
        }
    }
    ::pthread_sigmask(SIG_BLOCK, &guarded_, &before_);
}

TWriteSignalGuard::~TWriteSignalGuard() {
    ::pthread_sigmask(SIG_SETMASK, &before_, nullptr);
}

void TWriteSignalGuard::Consume() {
    const int error_number = errno;
    const timespec at_once{};
    while (::sigtimedwait(&guarded_, nullptr, &at_once) == -1 && errno == EINTR) {
    }
    errno = error_number;
}

std::unique_ptr<TFileHandle> OpenFile(const std::u16string& name, TFileMode mode,
                                      std::string& error_text) {
    if (HasEmbeddedZero(name)) {
        return Fail(EINVAL, error_text);
    }
    const std::string native = NativeName(name);
    struct stat info {};
    const mode_t existing = ::stat(native.c_str(), &info) == 0 ? info.st_mode : 0;
    const int flags = OpenFlags(mode, existing);
    const int descriptor =
        RetryInterrupted([&] { return ::open(native.c_str(), flags, mode_t{0666}); });
    if (descriptor < 0) {
        return Fail(errno, error_text);
    }
    const int unfit = ::fstat(descriptor, &info) != 0 ? errno : UnfitKind(info.st_mode, mode);
    if (unfit != 0) {
        ::close(descriptor);
        return Fail(unfit, error_text);
    }
    MakeBlocking(descriptor);
    return std::make_unique<TLinuxFile>(descriptor, SeekabilityOf(info.st_mode));
}

std::unique_ptr<TFileHandle> CreateTemporaryBeside(const std::u16string& target_name,
                                                   std::u16string& temporary_name,
                                                   std::string& error_text) {
    if (HasEmbeddedZero(target_name)) {
        return Fail(EINVAL, error_text);
    }
    const std::string target = NativeName(target_name);
    const int mode = ModeOfReplacement(target);
    if (mode < 0) {
        return Fail(errno, error_text);
    }
    for (int attempt = 0; attempt < kMaxNameAttempts; ++attempt) {
        const std::string name = FolderOf(target) + RandomName();
        const int descriptor = RetryInterrupted([&] {
            return ::open(name.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC,
                          static_cast<mode_t>(mode));
        });
        if (descriptor >= 0) {
            temporary_name = FromNative(name);
            return std::make_unique<TLinuxFile>(descriptor, skReal);
        }
        if (errno != EEXIST) {
            break;
        }
    }
    return Fail(errno, error_text);
}

std::unique_ptr<TFileHandle> CreateDeletingFile(const std::u16string& name,
                                                std::string& error_text) {
    if (GetFileKind(name) == fkOther) {
        return Fail(EINVAL, error_text);  // a device must not be deleted
    }
    auto file = OpenFile(name, fmCreate, error_text);
    if (file == nullptr) {
        return nullptr;
    }
    return std::make_unique<TDeletingFile>(std::move(file), name);
}

std::u16string ResolveLinkTarget(const std::u16string& target_name) {
    std::string name = NativeName(target_name);
    for (int depth = 0; depth < kMaxLinks; ++depth) {
        const std::string link = LinkContents(name);
        if (link.empty()) {
            return depth == 0 ? target_name : FromNative(name);
        }
        name = link.front() == '/' ? link : FolderOf(name) + link;
    }
    return target_name;  // a ring of links; opening it tells so
}

bool ReplaceFileAtomically(const std::u16string& temporary_name,
                           const std::u16string& target_name) {
    const std::string temporary = NativeName(temporary_name);
    const std::string target = NativeName(target_name);
    struct stat info {};
    if (::stat(target.c_str(), &info) == 0 && !TakeOverPermissions(temporary, info)) {
        return false;
    }
    return ::rename(temporary.c_str(), target.c_str()) == 0;
}

TFileKind GetFileKind(const std::u16string& name) {
    struct stat info {};
    if (HasEmbeddedZero(name) || ::stat(NativeName(name).c_str(), &info) != 0) {
        return fkNone;
    }
    if (S_ISDIR(info.st_mode)) {
        return fkFolder;
    }
    return S_ISREG(info.st_mode) ? fkRegular : fkOther;
}

bool IsPathSeparator(char16_t character) {
    return character == u'/';
}

bool FileExists(const std::u16string& name) {
    const TFileKind kind = GetFileKind(name);
    return kind == fkRegular || kind == fkOther;
}

bool FolderExists(const std::u16string& name) {
    return GetFileKind(name) == fkFolder;
}

bool RemoveFile(const std::u16string& name) {
    return !HasEmbeddedZero(name) && ::unlink(NativeName(name).c_str()) == 0;
}

bool CreateFolder(const std::u16string& name) {
    if (HasEmbeddedZero(name)) {
        return false;
    }
    std::error_code error;
    std::filesystem::create_directories(NativeName(name), error);
    return FolderExists(name);
}

std::u16string AbsolutePath(const std::u16string& name) {
    std::error_code error;
    const auto path = std::filesystem::absolute(NativeName(name), error);
    return error ? name : FromNative(path.native());
}

std::u16string TemporaryFolder() {
    const char* const named = std::getenv("TMPDIR");
    std::string folder = named != nullptr ? named : "";
    if (folder.empty() || !FolderExists(FromNative(folder))) {
        folder = "/tmp";
    }
    if (folder.back() != '/') {
        folder += '/';
    }
    return FromNative(folder);
}

std::optional<TFileTimes> GetFileTimes(const std::u16string& name) {
    struct stat info {};
    const std::string native = NativeName(name);
    if (HasEmbeddedZero(name) || ::stat(native.c_str(), &info) != 0) {
        return std::nullopt;
    }
    TFileTimes times;
    times.modified_ns = NanosecondsOf(info.st_mtim);
    times.accessed_ns = NanosecondsOf(info.st_atim);
    times.created_ns = std::min(times.modified_ns, NanosecondsOf(info.st_ctim));
    struct statx extended {};
    if (::statx(AT_FDCWD, native.c_str(), 0, STATX_BTIME, &extended) == 0 &&
        (extended.stx_mask & STATX_BTIME) != 0) {
        timespec birth{};
        birth.tv_sec = extended.stx_btime.tv_sec;
        birth.tv_nsec = extended.stx_btime.tv_nsec;
        times.created_ns = NanosecondsOf(birth);
    }
    return times;
}

bool SetFileTimes(const std::u16string& name, const TFileTimes& times) {
    // The system has no call that sets the time of creation.
    const std::array<timespec, 2> both{TimeOf(times.accessed_ns), TimeOf(times.modified_ns)};
    return !HasEmbeddedZero(name) &&
           ::utimensat(AT_FDCWD, NativeName(name).c_str(), both.data(), 0) == 0;
}

}  // namespace zm::platform
