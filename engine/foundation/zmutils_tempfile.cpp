#include "engine/foundation/zmutils_tempfile.h"

#include "engine/foundation/zmstreams_p.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/files.h"

namespace zm {

TZmTemporaryFileStream::TZmTemporaryFileStream(const std::u16string& FileName) {
    std::string reason;  // the message that callers know has no place for it
    handle_ = platform::CreateDeletingFile(FileName, reason);
    if (handle_ == nullptr) {
        throw EZmException("Unable to create " + Utf8FromUtf16(FileName));
    }
}

TZmTemporaryFileStream::~TZmTemporaryFileStream() = default;

std::int32_t TZmTemporaryFileStream::Read(void* buffer, std::int32_t count) {
    return ReadOrNothing(*handle_, buffer, count);
}

std::int32_t TZmTemporaryFileStream::Write(const void* buffer, std::int32_t count) {
    return WriteOrNothing(*handle_, buffer, count);
}

std::int64_t TZmTemporaryFileStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    return SeekOrStay(*handle_, offset, origin);
}

std::int64_t TZmTemporaryFileStream::GetSize() {
    return SizeOrNothing(*handle_);
}

}  // namespace zm
