#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

/// Values in streams of our own: little-endian, texts and blocks behind a 32-bit length.
namespace zm {

class TStream;

/// Reads values from a stream whose contents are not trusted: a length is checked against what is
/// left before anything is allocated, and the first read that falls short makes all later ones
/// fail. A failed read gives 0 and leaves its target as it was. Exceptions of the stream pass.
class TZmFieldReader {
public:
    /// Reads on from the stream's position. The stream outlives the reader.
    explicit TZmFieldReader(TStream& stream);

    std::uint8_t U8();
    std::int32_t S32();
    double F64();
    /// All of `count` bytes or none; false when they are not there.
    bool ReadBytes(void* target, std::size_t count);
    /// A 32-bit length and that many bytes (characters of two bytes, for wide text).
    bool ReadBlock(std::vector<std::uint8_t>& target);
    bool ReadText(std::string& target);
    bool ReadWideText(std::u16string& target);
    /// A 32-bit count of items of at least `item_bytes` bytes each; fails when so many cannot
    /// follow. -1 on failure.
    std::int32_t ReadCount(std::int32_t item_bytes);

    /// Bytes from here to the end of the stream.
    std::int64_t Remaining() const { return remaining_; }
    bool HasFailed() const { return failed_; }
    /// Makes all later reads fail, for values that cannot be.
    void Fail() { failed_ = true; }

private:
    bool ReadCounted(std::vector<std::uint8_t>& target, std::int64_t count);

    TStream& stream_;
    std::int64_t remaining_;
    bool failed_ = false;
};

/// Writes the same forms. A stream that takes fewer bytes than given raises EWriteError; a block
/// beyond 2^31 - 1 bytes too.
class TZmFieldWriter {
public:
    explicit TZmFieldWriter(TStream& stream) : stream_(stream) {}

    void U8(std::uint8_t value);
    void S32(std::int32_t value);
    void F64(double value);
    void WriteBytes(std::span<const std::uint8_t> bytes);
    void WriteBlock(std::span<const std::uint8_t> bytes);
    void WriteText(std::string_view text);
    void WriteWideText(std::u16string_view text);

private:
    void WriteLength(std::size_t length);

    TStream& stream_;
};

}  // namespace zm
