#pragma once

#include <cstdint>
#include <vector>

#include "engine/foundation/zmstreams.h"

/// Buffering over a caller's stream for codecs that read or write in small pieces. One stream
/// belongs to one codec call.
namespace zm {

class TZmBufferedReadStream : public TStream {
public:
    /// `input` is borrowed. With `use_relative_position` position 0 is where `input` stands now.
    /// The first block is fetched at once. A buffer size of 0 forwards every call.
    TZmBufferedReadStream(TStream* input, std::int32_t buffer_size, bool use_relative_position);
    /// Leaves the wrapped stream behind the last byte consumed.
    ~TZmBufferedReadStream() override;
    /// Reading past the end gives fewer bytes and sets OverPosition.
    std::int32_t Read(void* buffer, std::int32_t count) override;
    /// Raises EZmException "TZmBufferedReadStream cannot write!".
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    /// A seek from the end counts backwards whatever the sign of `offset`. Targets are limited
    /// to the stream; one at or past the end sets OverPosition.
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    /// Counted from position 0.
    std::int64_t GetSize() override;
    bool GetOverPosition() const { return fOverPosition; }

private:
    void Fetch();

    TStream* fStream;
    std::int32_t fBufferSize;
    std::vector<std::uint8_t> fMemory;
    std::int64_t fPosition = 0;
    std::int32_t fPositionBuf = 0;
    std::int64_t fSize = 0;
    std::int64_t fRelativePosition = 0;
    bool fOverPosition = false;
    std::int32_t fetched_ = 0;  // bytes of fMemory that the last fetch really brought
};

class TZmBufferedWriteStream : public TStream {
public:
    TZmBufferedWriteStream(TStream* output, std::int32_t buffer_size);
    /// Flushes.
    ~TZmBufferedWriteStream() override;
    /// Raises EZmException "TZmBufferedWriteStream cannot read!".
    std::int32_t Read(void* buffer, std::int32_t count) override;
    /// Bytes accepted; fewer than asked once the target has taken fewer than it was given.
    std::int32_t Write(const void* buffer, std::int32_t count) override;
    /// Flushes, then forwards: a seek to the current position forces data out.
    std::int64_t Seek(std::int64_t offset, TSeekOrigin origin) override;
    /// True once the target has taken fewer bytes than it was given.
    bool HasFailed() const { return failed_; }

private:
    void Flush();

    TStream* fStream;
    std::vector<std::uint8_t> fMemory;
    std::int32_t fBufferSize;
    std::int32_t fBufferPos = 0;
    bool failed_ = false;
};

}  // namespace zm
