#pragma once

#include <cstdint>

#include "engine/foundation/zmstreams.h"

namespace zm {

/// The stream interface that optional outside decoders take. The order of the operations is that
/// of the decoders' own interface.
class TZmStreamProvider {
public:
    virtual ~TZmStreamProvider() = default;
    virtual std::int64_t size() = 0;
    /// `origin` 0 counts from the start, 1 from the present position, 2 from the end; anything
    /// else does nothing. Returns the new position.
    virtual std::int64_t seek(std::int64_t offset, std::int32_t origin) = 0;
    virtual std::int64_t tell() = 0;
    /// Bytes moved; fewer than asked for, or 0, also when the stream raises.
    virtual std::int32_t silent_read(void* buffer, std::int32_t count) = 0;
    virtual std::int32_t silent_write(const void* buffer, std::int32_t count) = 0;
    /// The next byte, or -1 at the end.
    virtual std::int32_t silent_getc() = 0;
    virtual bool eof() = 0;
};

/// The interface over a stream, which is borrowed. Not thread-safe.
class TZmVCLStreamProvider : public TZmStreamProvider {
public:
    explicit TZmVCLStreamProvider(TStream* stream) : m_stream(stream) {}
    std::int64_t size() override { return m_stream->GetSize(); }
    std::int64_t seek(std::int64_t offset, std::int32_t origin) override;
    std::int64_t tell() override { return m_stream->GetPosition(); }
    std::int32_t silent_read(void* buffer, std::int32_t count) override;
    std::int32_t silent_write(const void* buffer, std::int32_t count) override;
    std::int32_t silent_getc() override;
    bool eof() override { return tell() >= size(); }

private:
    TStream* m_stream;
};

}  // namespace zm
