#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace zm {

class TStream;

/// Bounded reader of bytes in memory: reads past the end give 0 and are remembered. All header
/// parsing goes through it; file bytes are never cast to records.
class TZmByteReader {
public:
    explicit TZmByteReader(std::span<const std::uint8_t> bytes) : bytes_(bytes) {}

    std::uint8_t U8();
    std::uint16_t U16LE();
    std::uint16_t U16BE();
    std::uint32_t U32LE();
    std::uint32_t U32BE();
    std::int32_t S32LE() { return static_cast<std::int32_t>(U32LE()); }
    void Skip(std::size_t count);
    /// Moves to an absolute position; a target past the end fails.
    void MoveTo(std::size_t position);
    std::size_t Position() const { return position_; }
    std::size_t Remaining() const { return bytes_.size() - position_; }
    /// True when any read or move so far ran past the end.
    bool HasFailed() const { return failed_; }

private:
    bool Take(std::size_t count);

    std::span<const std::uint8_t> bytes_;
    std::size_t position_ = 0;
    bool failed_ = false;
};

/// Little-endian writers into a buffer that the caller sized.
void PutU16LE(std::uint8_t* target, std::uint32_t value);
void PutU32LE(std::uint8_t* target, std::uint32_t value);

}  // namespace zm
