// Exchanging a marker of a JPEG file without recoding the image (ITU-T T.81 annex B: segments of a
// marker, a big-endian length that counts itself, and bytes). The segments before the first scan
// are walked; from there on the file is copied as it is.

#include <algorithm>
#include <array>
#include <cstdint>
#include <vector>

#include "engine/codecs/jpegfilt.h"
#include "engine/codecs/jpegfilt_p.h"
#include "engine/io/zmbufferedstreams.h"

namespace zm {

namespace {

constexpr std::uint8_t kMarkerStartOfImage = 0xD8;
constexpr std::uint8_t kMarkerEndOfImage = 0xD9;
constexpr std::uint8_t kMarkerStartOfScan = 0xDA;
constexpr std::uint8_t kMarkerFirstRestart = 0xD0;
constexpr std::uint8_t kMarkerTemporary = 0x01;
constexpr std::size_t kLengthBytes = 2;
constexpr std::int32_t kCopyBytes = 65536;

using TBytes = std::span<const std::uint8_t>;

/// Where a block lies, and how the old one is known.
struct TBlockKind {
    std::uint8_t type;
    bool (*is_block)(std::uint8_t type, TBytes data);
};

bool IsExifMarker(std::uint8_t type, TBytes data) {
    return type == kMarkerApp1 && IsExifMarkerData(data);
}

constexpr TBlockKind kBlockKinds[] = {{kMarkerApp13, IsJpegResourceMarker},
                                      {kMarkerApp1, IsExifMarker}};

class TMarkerExchange {
public:
    TMarkerExchange(TStream& input, TStream& output, const TBlockKind& kind, TBytes data)
        : input_(input), output_(output), kind_(kind), data_(data) {}
    [[nodiscard]] bool Run();

private:
    enum TNext : std::uint8_t { kNextSegment, kNextCopyRest, kNextFail };

    [[nodiscard]] TNext TakeSegment();
    /// Code of the next marker, fill bytes skipped; 0 where there is none.
    std::uint8_t ReadMarkerCode();
    [[nodiscard]] bool ReadSegment();
    [[nodiscard]] bool WriteSegment(std::uint8_t type, TBytes data);
    [[nodiscard]] bool WriteCode(std::uint8_t type);
    [[nodiscard]] bool WriteNewMarker();
    [[nodiscard]] bool CopyRest();
    [[nodiscard]] bool WriteAll(const std::uint8_t* bytes, std::size_t count);

    TStream& input_;
    TStream& output_;
    const TBlockKind& kind_;
    TBytes data_;
    std::vector<std::uint8_t> segment_;  // bytes behind the length
    bool is_written_ = false;            // the new marker
};

bool TMarkerExchange::WriteAll(const std::uint8_t* bytes, std::size_t count) {
    const auto wanted = static_cast<std::int32_t>(count);
    return wanted == 0 || output_.Write(bytes, wanted) == wanted;
}

bool TMarkerExchange::WriteCode(std::uint8_t type) {
    const std::array<std::uint8_t, 2> code{0xFF, type};
    return WriteAll(code.data(), code.size());
}

bool TMarkerExchange::WriteSegment(std::uint8_t type, TBytes data) {
    const std::size_t length = data.size() + kLengthBytes;
    const std::array<std::uint8_t, 2> length_bytes{static_cast<std::uint8_t>(length >> 8),
                                                   static_cast<std::uint8_t>(length)};
    return WriteCode(type) && WriteAll(length_bytes.data(), length_bytes.size()) &&
           WriteAll(data.data(), data.size());
}

bool TMarkerExchange::WriteNewMarker() {
    if (is_written_ || data_.empty()) {
        return true;
    }
    is_written_ = true;
    return WriteSegment(kind_.type, data_);
}

std::uint8_t TMarkerExchange::ReadMarkerCode() {
    std::uint8_t byte = 0;
    if (input_.Read(&byte, 1) != 1 || byte != 0xFF) {
        return 0;
    }
    while (byte == 0xFF) {
        if (input_.Read(&byte, 1) != 1) {
            return 0;
        }
    }
    return byte;
}

bool TMarkerExchange::ReadSegment() {
    std::array<std::uint8_t, kLengthBytes> length_bytes{};
    if (input_.Read(length_bytes.data(), kLengthBytes) != kLengthBytes) {
        return false;
    }
    const std::size_t length = static_cast<std::size_t>(length_bytes[0]) << 8 | length_bytes[1];
    if (length < kLengthBytes) {
        return false;
    }
    segment_.resize(length - kLengthBytes);
    const auto wanted = static_cast<std::int32_t>(segment_.size());
    return wanted == 0 || input_.Read(segment_.data(), wanted) == wanted;
}

/// The new marker goes behind those that have to be the first of a file.
TMarkerExchange::TNext TMarkerExchange::TakeSegment() {
    const auto next_if = [](bool is_done) { return is_done ? kNextSegment : kNextFail; };
    const std::uint8_t type = ReadMarkerCode();
    const bool is_alone =
        type == kMarkerTemporary || (type >= kMarkerFirstRestart && type < kMarkerStartOfImage);
    const bool is_misplaced = type == 0 || type == kMarkerStartOfImage;
    if (is_misplaced || (type != kMarkerApp0 && !WriteNewMarker())) {
        return kNextFail;
    }
    if (type == kMarkerStartOfScan || type == kMarkerEndOfImage) {
        return WriteCode(type) ? kNextCopyRest : kNextFail;
    }
    if (is_alone) {
        return next_if(WriteCode(type));
    }
    if (!ReadSegment()) {
        return kNextFail;
    }
    return next_if(kind_.is_block(type, segment_) || WriteSegment(type, segment_));
}

bool TMarkerExchange::CopyRest() {
    segment_.resize(kCopyBytes);
    while (true) {
        const std::int32_t got = input_.Read(segment_.data(), kCopyBytes);
        if (got <= 0) {
            return true;
        }
        if (!WriteAll(segment_.data(), static_cast<std::size_t>(got))) {
            return false;
        }
    }
}

bool TMarkerExchange::Run() {
    if (ReadMarkerCode() != kMarkerStartOfImage || !WriteCode(kMarkerStartOfImage)) {
        return false;
    }
    TNext next = kNextSegment;
    while (next == kNextSegment) {
        next = TakeSegment();
    }
    return next == kNextCopyRest && CopyRest();
}

}  // namespace

bool ExchangeJpegBlock(TStream& input, TStream& output, TJpegBlock block,
                       std::span<const std::uint8_t> data) {
    if (data.size() > kJpegMarkerDataBytes) {
        return false;
    }
    TZmBufferedReadStream reader(&input, kJpegStreamBufferBytes, /*use_relative_position=*/true);
    const std::int32_t offset = FindJpegStart(reader);
    if (offset < 0) {
        return false;
    }
    reader.SetPosition(offset);
    return TMarkerExchange(reader, output, kBlockKinds[block], data).Run();
}

}  // namespace zm
