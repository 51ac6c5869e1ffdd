#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// Byte streams. A stream belongs to one thread at a time.
namespace zm {

namespace platform {
class TFileHandle;
}

enum TSeekOrigin : std::uint8_t { soBeginning, soCurrent, soEnd };

/// A file could not be opened or created; `what()` holds the file's name and the system's reason.
class EFOpenError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};
class EFCreateError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};
/// ReadBuffer, WriteBuffer: fewer bytes than asked for.
class EReadError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};
class EWriteError : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class TStream {
public:
    TStream() = default;
    TStream(const TStream&) = delete;
    TStream& operator=(const TStream&) = delete;
    virtual ~TStream() = default;

    /// Reads up to `count` bytes; returns how many came, less at the end, 0 for a count below 1.
    virtual std::int32_t Read(void* buffer, std::int32_t count) = 0;
    /// Writes `count` bytes; returns how many went, less when the target is full.
    virtual std::int32_t Write(const void* buffer, std::int32_t count) = 0;
    /// Moves the position and returns it. A target below 0 becomes 0.
    virtual std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) = 0;

    virtual std::int64_t GetSize();
    std::int64_t GetPosition() { return Seek(0, soCurrent); }
    void SetPosition(std::int64_t position) { Seek(position, soBeginning); }
    /// Whole reads and writes of any size; they raise EReadError, EWriteError when short.
    void ReadBuffer(void* buffer, std::size_t count);
    void WriteBuffer(const void* buffer, std::size_t count);
};

/// Bytes in memory that grow as they are written.
class TMemoryStream : public TStream {
public:
    TMemoryStream() = default;
    explicit TMemoryStream(std::vector<std::uint8_t> bytes) : bytes_(std::move(bytes)) {}
    std::int32_t Read(void* buffer, std::int32_t count) override;
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    std::int64_t GetSize() override { return static_cast<std::int64_t>(bytes_.size()); }
    const std::vector<std::uint8_t>& Bytes() const { return bytes_; }

private:
    std::vector<std::uint8_t> bytes_;
    std::int64_t position_ = 0;
};

/// A read-only view of bytes that somebody else keeps alive.
class TBorrowedMemoryStream : public TStream {
public:
    TBorrowedMemoryStream(const void* data, std::int64_t size)
        : data_(static_cast<const std::uint8_t*>(data)), size_(size) {}
    std::int32_t Read(void* buffer, std::int32_t count) override;
    std::int32_t Write(const void*, std::int32_t) override { return 0; }
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    std::int64_t GetSize() override { return size_; }

private:
    const std::uint8_t* data_;
    std::int64_t size_;
    std::int64_t position_ = 0;
};

/// How a TFileStream opens its file.
enum TFileMode : std::uint8_t {
    fmOpenRead,       ///< existing file, read, shared with other readers
    fmOpenReadWrite,  ///< existing file, read and write, not shared
    fmCreate,         ///< new or emptied file, read and write
};

/// A file on disk. The constructor raises EFOpenError or EFCreateError.
class TFileStream : public TStream {
public:
    TFileStream(const std::u16string& file_name, TFileMode mode);
    ~TFileStream() override;
    std::int32_t Read(void* buffer, std::int32_t count) override;
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    std::int64_t GetSize() override;

private:
    std::unique_ptr<platform::TFileHandle> handle_;
};

/// The stream of a whole-file save: it writes a temporary file in the target's folder and puts
/// it in the target's place on Commit, so that a failed or killed save leaves the old file as it
/// was. Destruction without Commit removes the temporary file. The constructor raises
/// EFCreateError with the target's name and the system's reason. A target that is a link is
/// replaced at the link's end; an existing target's permissions are kept.
class TZmSaveFileStream : public TStream {
public:
    explicit TZmSaveFileStream(const std::u16string& target_name);
    ~TZmSaveFileStream() override;
    std::int32_t Read(void* buffer, std::int32_t count) override;
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    std::int64_t GetSize() override;
    /// True when a write fell short or failed.
    bool HasFailed() const { return failed_; }
    /// Closes the file and puts it in the target's place; false (and the old file kept) when any
    /// write failed or the system refuses.
    [[nodiscard]] bool Commit();

private:
    std::u16string target_name_;
    std::u16string temporary_name_;
    std::unique_ptr<platform::TFileHandle> handle_;
    bool failed_ = false;
};

}  // namespace zm
