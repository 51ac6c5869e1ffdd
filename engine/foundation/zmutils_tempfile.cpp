#include "engine/foundation/zmutils_tempfile.h"

#include <algorithm>

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
    return std::max(handle_->Read(buffer, count), 0);
}

std::int32_t TZmTemporaryFileStream::Write(const void* buffer, std::int32_t count) {
    return std::max(handle_->Write(buffer, count), 0);
}

std::int64_t TZmTemporaryFileStream::Seek(std::int64_t offset, TSeekOrigin origin) {
    const std::int64_t position = handle_->Seek(offset, origin);
    return position >= 0 ? position : std::max<std::int64_t>(handle_->Seek(0, soCurrent), 0);
}

std::int64_t TZmTemporaryFileStream::GetSize() {
    return std::max<std::int64_t>(handle_->GetSize(), 0);
}

}  // namespace zm
