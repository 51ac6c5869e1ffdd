#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "engine/foundation/zmstreams.h"

namespace zm {

/// A file that is created or emptied, and deleted with the stream. Others may read it while it
/// lives. Where the system can, the file also goes when the process dies.
class TZmTemporaryFileStream : public TStream {
public:
    /// Failure raises EZmException "Unable to create " and the file name.
    explicit TZmTemporaryFileStream(const std::u16string& FileName);
    ~TZmTemporaryFileStream() override;
    std::int32_t Read(void* buffer, std::int32_t count) override;
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    std::int64_t GetSize() override;

private:
    std::unique_ptr<platform::TFileHandle> handle_;
};

}  // namespace zm
