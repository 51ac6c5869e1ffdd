#include <algorithm>
#include <array>
#include <string_view>

#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zalmoio_headers_p.h"
#include "engine/io/zmfiletypes.h"

namespace zm {

namespace {

constexpr std::int32_t kHeaderBytes = 12;
constexpr std::int32_t kOldPcxHeaderBytes = 4;
constexpr std::size_t kLengthOffset = 8;

using THeader = std::array<std::uint8_t, kHeaderBytes>;

std::string_view MagicOf(std::int32_t file_type) {
    switch (file_type) {
        case ioJPEG: return "JFIF";
        case ioPCX: return "PCX2";
        case ioTIFF: return "TIFF";
        default: return {};
    }
}

/// Whether the first bytes are the text and a zero.
bool StartsWithText(const THeader& header, std::string_view text) {
    return std::equal(text.begin(), text.end(), header.begin()) && header[text.size()] == 0;
}

std::int32_t ReadAll(TStream& stream, THeader& header) {
    std::int32_t done = 0;
    while (done < kHeaderBytes) {
        const std::int32_t got = stream.Read(header.data() + done, kHeaderBytes - done);
        if (got < 1) {
            break;
        }
        done += got;
    }
    return done;
}

}  // namespace

bool HasStreamHeader(std::int32_t file_type) {
    return !MagicOf(file_type).empty();
}

TZmStreamHeaderFind SkipStreamHeader(std::int32_t file_type, TStream& stream) {
    TZmStreamHeaderFind found;
    if (!HasStreamHeader(file_type)) {
        return found;
    }
    const std::int64_t start = stream.GetPosition();
    THeader header{};
    const std::int32_t got = ReadAll(stream, header);
    if (got == kHeaderBytes && StartsWithText(header, MagicOf(file_type))) {
        TZmByteReader reader(header);
        reader.Skip(kLengthOffset);
        found.next = start + kHeaderBytes + std::max(reader.S32LE(), 0);
    } else if (file_type == ioPCX && got >= kOldPcxHeaderBytes && StartsWithText(header, "PCX")) {
        stream.SetPosition(start + kOldPcxHeaderBytes);
    } else if (file_type == ioJPEG) {
        stream.SetPosition(start);
    } else {
        found.is_acceptable = false;
    }
    return found;
}

std::int64_t ReserveStreamHeader(TStream& stream) {
    const std::int64_t start = stream.GetPosition();
    const THeader room{};
    stream.WriteBuffer(room.data(), room.size());
    return start;
}

void FillStreamHeader(std::int32_t file_type, TStream& stream, std::int64_t start) {
    const std::int64_t end = stream.GetPosition();
    THeader header{};
    const std::string_view magic = MagicOf(file_type);
    std::copy(magic.begin(), magic.end(), header.begin());
    const std::int64_t length = end - start - kHeaderBytes;
    PutU32LE(header.data() + kLengthOffset, static_cast<std::uint32_t>(SaturateToInt32(length)));
    stream.SetPosition(start);
    stream.WriteBuffer(header.data(), header.size());
    stream.SetPosition(end);
}

}  // namespace zm
