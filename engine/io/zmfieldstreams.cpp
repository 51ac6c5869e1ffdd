#include "engine/io/zmfieldstreams.h"

#include <algorithm>
#include <array>
#include <bit>

#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams.h"

namespace zm {

namespace {

/// Blocks are read in pieces, so that a stream that only claims to be long costs no memory.
constexpr std::int64_t kPieceBytes = std::int64_t{1} << 20;

}  // namespace

TZmFieldReader::TZmFieldReader(TStream& stream)
    : stream_(stream),
      remaining_(std::max<std::int64_t>(stream.GetSize() - stream.GetPosition(), 0)) {}

bool TZmFieldReader::ReadCounted(std::vector<std::uint8_t>& target, std::int64_t count) {
    if (failed_ || count < 0 || count > remaining_ || !FitsAddressSpace(count)) {
        failed_ = true;
        return false;
    }
    std::vector<std::uint8_t> bytes;
    for (std::int64_t done = 0; done < count;) {
        const auto piece = static_cast<std::int32_t>(std::min(kPieceBytes, count - done));
        bytes.resize(static_cast<std::size_t>(done + piece));
        const std::int32_t got = stream_.Read(bytes.data() + done, piece);
        if (got < 1) {
            failed_ = true;
            return false;
        }
        done += got;
    }
    bytes.resize(static_cast<std::size_t>(count));
    remaining_ -= count;
    target = std::move(bytes);
    return true;
}

bool TZmFieldReader::ReadBytes(void* target, std::size_t count) {
    std::vector<std::uint8_t> bytes;
    if (!ReadCounted(bytes, static_cast<std::int64_t>(count))) {
        return false;
    }
    std::copy(bytes.begin(), bytes.end(), static_cast<std::uint8_t*>(target));
    return true;
}

std::uint8_t TZmFieldReader::U8() {
    std::uint8_t value = 0;
    ReadBytes(&value, 1);
    return value;
}

std::int32_t TZmFieldReader::S32() {
    std::array<std::uint8_t, 4> bytes{};
    ReadBytes(bytes.data(), bytes.size());
    return TZmByteReader(bytes).S32LE();
}

double TZmFieldReader::F64() {
    std::array<std::uint8_t, 8> bytes{};
    ReadBytes(bytes.data(), bytes.size());
    TZmByteReader reader(bytes);
    const std::uint64_t low = reader.U32LE();
    const std::uint64_t high = reader.U32LE();
    return std::bit_cast<double>(high << 32 | low);
}

bool TZmFieldReader::ReadBlock(std::vector<std::uint8_t>& target) {
    return ReadCounted(target, S32());
}

bool TZmFieldReader::ReadText(std::string& target) {
    std::vector<std::uint8_t> bytes;
    if (!ReadBlock(bytes)) {
        return false;
    }
    target.assign(bytes.begin(), bytes.end());
    return true;
}

bool TZmFieldReader::ReadWideText(std::u16string& target) {
    std::vector<std::uint8_t> bytes;
    if (!ReadCounted(bytes, std::int64_t{S32()} * 2)) {
        return false;
    }
    TZmByteReader reader(bytes);
    target.clear();
    for (std::size_t i = 0; i < bytes.size() / 2; ++i) {
        target.push_back(static_cast<char16_t>(reader.U16LE()));
    }
    return true;
}

std::int32_t TZmFieldReader::ReadCount(std::int32_t item_bytes) {
    const std::int32_t count = S32();
    if (failed_ || count < 0 || std::int64_t{count} * item_bytes > remaining_) {
        failed_ = true;
        return -1;
    }
    return count;
}

void TZmFieldWriter::U8(std::uint8_t value) {
    stream_.WriteBuffer(&value, 1);
}

void TZmFieldWriter::S32(std::int32_t value) {
    std::array<std::uint8_t, 4> bytes{};
    PutU32LE(bytes.data(), static_cast<std::uint32_t>(value));
    WriteBytes(bytes);
}

void TZmFieldWriter::F64(double value) {
    const auto bits = std::bit_cast<std::uint64_t>(value);
    std::array<std::uint8_t, 8> bytes{};
    PutU32LE(bytes.data(), static_cast<std::uint32_t>(bits));
    PutU32LE(bytes.data() + 4, static_cast<std::uint32_t>(bits >> 32));
    WriteBytes(bytes);
}

void TZmFieldWriter::WriteBytes(std::span<const std::uint8_t> bytes) {
    stream_.WriteBuffer(bytes.data(), bytes.size());
}

void TZmFieldWriter::WriteLength(std::size_t length) {
    if (length > static_cast<std::size_t>(kMaxInt32)) {
        throw EWriteError("Stream write error");
    }
    S32(static_cast<std::int32_t>(length));
}

void TZmFieldWriter::WriteBlock(std::span<const std::uint8_t> bytes) {
    WriteLength(bytes.size());
    WriteBytes(bytes);
}

void TZmFieldWriter::WriteText(std::string_view text) {
    WriteLength(text.size());
    stream_.WriteBuffer(text.data(), text.size());
}

void TZmFieldWriter::WriteWideText(std::u16string_view text) {
    WriteLength(text.size());
    std::vector<std::uint8_t> bytes(text.size() * 2);
    for (std::size_t i = 0; i < text.size(); ++i) {
        PutU16LE(bytes.data() + 2 * i, text[i]);
    }
    WriteBytes(bytes);
}

}  // namespace zm
