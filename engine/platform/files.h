#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "engine/foundation/zmstreams.h"

/// Files by Unicode name. On Linux names are UTF-8 bytes (zmstrings.h tells the mapping).
namespace zm::platform {

/// An open file; closes itself.
class TFileHandle {
public:
    virtual ~TFileHandle() = default;
    /// Bytes moved; -1 on a failure of the system.
    virtual std::int32_t Read(void* buffer, std::int32_t count) = 0;
    virtual std::int32_t Write(const void* buffer, std::int32_t count) = 0;
    /// The new position; -1 on a failure. A target below 0 becomes 0.
    virtual std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) = 0;
    virtual std::int64_t GetSize() = 0;
    /// Closes now; false when the system reports that data could not be written.
    virtual bool Close() = 0;
};

/// Opens or creates a file; nil on failure, with the system's reason in `error_text` (UTF-8). A
/// device is opened as it is, a pipe or socket for writing only and without waiting for a reader.
std::unique_ptr<TFileHandle> OpenFile(const std::u16string& name, TFileMode mode,
                                      std::string& error_text);

/// Creates a new file with an unused name in the folder of `target_name` (which may be
/// relative). `temporary_name` receives its name. Nil on failure, also when `target_name` is a
/// file that must not be written.
std::unique_ptr<TFileHandle> CreateTemporaryBeside(const std::u16string& target_name,
                                                   std::u16string& temporary_name,
                                                   std::string& error_text);

/// Creates or empties a file that goes with its handle: where the system can do so even when
/// the process dies. Others may read it meanwhile. Nil on failure, also when the name stands for
/// anything but a plain file.
std::unique_ptr<TFileHandle> CreateDeletingFile(const std::u16string& name,
                                                std::string& error_text);

/// What a name stands for; links are followed.
enum TFileKind : std::uint8_t { fkNone, fkRegular, fkFolder, fkOther };
TFileKind GetFileKind(const std::u16string& name);

/// Whether a character ends a part of a path.
bool IsPathSeparator(char16_t character);

/// Name that saving to `target_name` must replace: the end of a chain of links, or the name.
std::u16string ResolveLinkTarget(const std::u16string& target_name);

/// Puts `temporary_name` in the place of `target_name` in one step, keeping an existing
/// target's permissions; false when refused, and both files then stay as they are.
bool ReplaceFileAtomically(const std::u16string& temporary_name, const std::u16string& target_name);

/// True when a file (not a folder) of that name exists; links are followed.
bool FileExists(const std::u16string& name);
bool FolderExists(const std::u16string& name);
bool RemoveFile(const std::u16string& name);
/// Makes the folder and its missing parents; true when it is there afterwards.
bool CreateFolder(const std::u16string& name);
/// Absolute form of a name, without touching the file system further than the current folder.
std::u16string AbsolutePath(const std::u16string& name);
/// The system's folder for temporary files, with trailing separator.
std::u16string TemporaryFolder();

struct TFileTimes {
    std::int64_t created_ns = 0;  ///< nanoseconds since 1970-01-01 UTC
    std::int64_t modified_ns = 0;
    std::int64_t accessed_ns = 0;
};
std::optional<TFileTimes> GetFileTimes(const std::u16string& name);
bool SetFileTimes(const std::u16string& name, const TFileTimes& times);

}  // namespace zm::platform
