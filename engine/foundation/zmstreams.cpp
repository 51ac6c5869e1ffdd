#include "engine/foundation/zmstreams.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <new>

#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams_p.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/files.h"

namespace zm {
namespace {

/// Where a seek leads in a block of known size; never below 0, and short of overflow.
std::int64_t SeekTarget(std::int64_t position, std::int64_t size, std::int64_t offset,
                        TSeekOrigin origin) {
    const std::int64_t base = origin == soBeginning ? 0 : origin == soCurrent ? position : size;
    if (offset > std::numeric_limits<std::int64_t>::max() - base) {
        return std::numeric_limits<std::int64_t>::max();
    }
    return std::max<std::int64_t>(base + offset, 0);
}

/// Copies out of a block from `position`, which moves on.
std::int32_t ReadFrom(const std::uint8_t* data, std::int64_t size, std::int64_t& position,
                      void* buffer, std::int32_t count) {
    if (count < 1 || position >= size) {
        return 0;
    }
    const auto moved = static_cast<std::int32_t>(std::min<std::int64_t>(count, size - position));
    std::memcpy(buffer, data + position, static_cast<std::size_t>(moved));
    position += moved;
    return moved;
}

std::string FailureText(const char* action, const std::u16string& name, const std::string& reason) {
    return std::string("Cannot ") + action + " file \"" + Utf8FromUtf16(name) + "\". " + reason;
}

constexpr std::int32_t kPieceBytes = 1 << 30;  // largest piece of one call in whole transfers

/// The next piece of a whole transfer.
std::int32_t PieceOf(std::size_t count) {
    return static_cast<std::int32_t>(std::min<std::size_t>(count, kPieceBytes));
}

}  // namespace

std::int64_t TStream::GetSize() {
    const std::int64_t position = GetPosition();
    const std::int64_t size = Seek(0, soEnd);
    SetPosition(position);
    return size;
}

void TStream::ReadBuffer(void* buffer, std::size_t count) {
    auto* target = static_cast<std::uint8_t*>(buffer);
    while (count > 0) {
        const std::int32_t moved = Read(target, PieceOf(count));
        if (moved < 1) {
            throw EReadError("Stream read error");
        }
        target += moved;
        count -= static_cast<std::size_t>(moved);
    }
}

void TStream::WriteBuffer(const void* buffer, std::size_t count) {
    const auto* source = static_cast<const std::uint8_t*>(buffer);
    while (count > 0) {
        const std::int32_t moved = Write(source, PieceOf(count));
        if (moved < 1) {
            throw EWriteError("Stream write error");
        }
        source += moved;
        count -= static_cast<std::size_t>(moved);
    }
}

std::int32_t TMemoryStream::Read(void* buffer, std::int32_t count) {
    const auto size = static_cast<std::int64_t>(bytes_.size());
    return ReadFrom(bytes_.data(), size, position_, buffer, count);
}

std::int32_t TMemoryStream::Write(const void* buffer, std::int32_t count) {
    if (count < 1) {
        return 0;
    }
    const std::int64_t room = std::numeric_limits<std::int64_t>::max() - position_;
    if (count > room || !FitsAddressSpace(position_ + count)) {
        return 0;
    }
    const auto end = static_cast<std::size_t>(position_ + count);
    if (end > bytes_.size()) {
        try {
            bytes_.resize(end);
        } catch (const std::bad_alloc&) {
            return 0;  // a full target, which the short count tells
        } catch (const std::length_error&) {
            return 0;
        }
    }
    std::memcpy(bytes_.data() + position_, buffer, static_cast<std::size_t>(count));
    position_ += count;
    return count;
}

std::int64_t TMemoryStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    position_ = SeekTarget(position_, GetSize(), offset, origin);
    return position_;
}

std::int32_t TBorrowedMemoryStream::Read(void* buffer, std::int32_t count) {
    return ReadFrom(data_, size_, position_, buffer, count);
}

std::int64_t TBorrowedMemoryStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    position_ = SeekTarget(position_, size_, offset, origin);
    return position_;
}

TFileStream::TFileStream(const std::u16string& file_name, TFileMode mode) {
    std::string reason;
    handle_ = platform::OpenFile(file_name, mode, reason);
    if (handle_ != nullptr) {
        return;
    }
    if (mode == fmCreate) {
        throw EFCreateError(FailureText("create", file_name, reason));
    }
    throw EFOpenError(FailureText("open", file_name, reason));
}

TFileStream::~TFileStream() = default;

std::int32_t TFileStream::Read(void* buffer, std::int32_t count) {
    return ReadOrNothing(*handle_, buffer, count);
}

std::int32_t TFileStream::Write(const void* buffer, std::int32_t count) {
    return WriteOrNothing(*handle_, buffer, count);
}

std::int64_t TFileStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    return SeekOrStay(*handle_, offset, origin);
}

std::int64_t TFileStream::GetSize() {
    return SizeOrNothing(*handle_);
}

TZmSaveFileStream::TZmSaveFileStream(const std::u16string& target_name)
    : target_name_(platform::ResolveLinkTarget(target_name)) {
    std::string reason;
    if (platform::GetFileKind(target_name_) == platform::fkOther) {
        // A device or pipe cannot be replaced; the bytes go to it as they come.
        handle_ = platform::OpenFile(target_name_, fmCreate, reason);
    } else {
        handle_ = platform::CreateTemporaryBeside(target_name_, temporary_name_, reason);
    }
    if (handle_ == nullptr) {
        throw EFCreateError(FailureText("create", target_name, reason));
    }
}

/// A process that is killed leaves its temporary file behind, and a later save lets it lie: nothing
/// about such a file tells whether a save of another thread, process or machine still writes it.
TZmSaveFileStream::~TZmSaveFileStream() {
    handle_.reset();  // an open file cannot be removed everywhere
    if (!temporary_name_.empty()) {
        platform::RemoveFile(temporary_name_);
    }
}

std::int32_t TZmSaveFileStream::Read(void* buffer, std::int32_t count) {
    return handle_ == nullptr ? 0 : ReadOrNothing(*handle_, buffer, count);
}

std::int32_t TZmSaveFileStream::Write(const void* buffer, std::int32_t count) {
    if (count < 1) {
        return 0;
    }
    const std::int32_t moved = handle_ == nullptr ? 0 : WriteOrNothing(*handle_, buffer, count);
    failed_ = failed_ || moved < count;
    return moved;
}

std::int64_t TZmSaveFileStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    if (handle_ == nullptr) {
        return 0;
    }
    const std::int64_t position = handle_->Seek(offset, origin);
    if (position >= 0) {
        return position;
    }
    failed_ = true;  // what is written next would land in a wrong place
    return std::max<std::int64_t>(handle_->Seek(0, soCurrent), 0);
}

std::int64_t TZmSaveFileStream::GetSize() {
    return handle_ == nullptr ? 0 : SizeOrNothing(*handle_);
}

bool TZmSaveFileStream::Commit() {
    if (handle_ == nullptr) {
        return false;
    }
    const bool closed = handle_->Close();
    handle_.reset();
    failed_ = failed_ || !closed;
    if (failed_ || temporary_name_.empty()) {
        return !failed_;
    }
    if (!platform::ReplaceFileAtomically(temporary_name_, target_name_)) {
        failed_ = true;
        return false;
    }
    temporary_name_.clear();
    return true;
}

}  // namespace zm
