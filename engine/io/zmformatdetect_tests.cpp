#include <algorithm>
#include <exception>
#include <optional>
#include <string>
#include <string_view>

#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmformatdetect_tests_p.h"

namespace zm {

namespace {

bool StartsWith(std::span<const std::uint8_t> bytes, std::string_view text) {
    return bytes.size() >= text.size() &&
           std::equal(text.begin(), text.end(), bytes.begin(),
                      [](char a, std::uint8_t b) { return static_cast<std::uint8_t>(a) == b; });
}

bool IsByteOrderMark(std::span<const std::uint8_t> bytes) {
    return StartsWith(bytes, "MM") || StartsWith(bytes, "II");
}

}  // namespace

TDetectSource::TDetectSource(TStream& stream)
    : stream_(&stream),
      start_(stream.GetPosition()),
      size_(std::max<std::int64_t>(stream.GetSize() - start_, 0)) {}

TDetectSource::~TDetectSource() {
    try {
        Rewind();
    } catch (const std::exception&) {
        // A destructor cannot report; whoever uses the broken stream next meets the failure.
    }
}

void TDetectSource::Rewind() {
    stream_->SetPosition(start_);
}

void TDetectSource::MoveWindow(std::int64_t offset) {
    window_offset_ = offset;
    window_filled_ = 0;
    stream_->SetPosition(start_ + offset);
    while (window_filled_ < kWindowBytes) {
        const std::int32_t got =
            stream_->Read(window_.data() + window_filled_,
                          static_cast<std::int32_t>(kWindowBytes - window_filled_));
        if (got <= 0) {
            break;
        }
        window_filled_ += got;
    }
}

std::span<const std::uint8_t> TDetectSource::BytesAt(std::int64_t offset, std::int64_t count) {
    if (offset < 0 || offset >= size_) {
        return {};
    }
    count = std::min({count, size_ - offset, kWindowBytes});
    const bool inside = window_filled_ >= 0 && offset >= window_offset_ &&
                        offset + count <= window_offset_ + kWindowBytes;
    if (!inside) {
        MoveWindow(offset);
    }
    const std::int64_t first = offset - window_offset_;
    const std::int64_t there = std::clamp<std::int64_t>(window_filled_ - first, 0, count);
    return {window_.data() + first, static_cast<std::size_t>(there)};
}

TZmByteReader TDetectSource::Header(std::int64_t count) {
    const std::span<const std::uint8_t> bytes = BytesAt(0, count);
    TZmByteReader reader(bytes);
    if (static_cast<std::int64_t>(bytes.size()) < count) {
        reader.MoveTo(bytes.size() + 1);
    }
    return reader;
}

std::int32_t TDetectSource::ByteAt(std::int64_t offset) {
    const std::span<const std::uint8_t> bytes = BytesAt(offset, 1);
    return bytes.empty() ? -1 : bytes[0];
}

bool HasZeroPaddedMagic(TDetectSource& source, std::string_view magic, std::int64_t read_bytes) {
    const std::span<const std::uint8_t> bytes = source.BytesAt(0, read_bytes);
    return static_cast<std::int64_t>(bytes.size()) == read_bytes && StartsWith(bytes, magic) &&
           bytes[magic.size()] == 0;
}

bool IsGIF(TDetectSource& source) {
    return StartsWith(source.BytesAt(0, 13), "GIF");
}

bool IsBMP(TDetectSource& source) {
    return source.Header(14).U16LE() == 0x4D42;
}

bool IsPCX(TDetectSource& source) {
    TZmByteReader header = source.Header(128);
    const bool has_mark = header.U8() == 10;
    return has_mark && header.U8() <= 5;
}

bool IsPNG(TDetectSource& source) {
    return StartsWith(source.BytesAt(0, 4), "\x89PNG");
}

bool IsDICOM(TDetectSource& source) {
    return StartsWith(source.BytesAt(128, 4), "DICM");
}

bool IsIconDirectory(TDetectSource& source, std::uint16_t type_word) {
    constexpr std::int64_t kHeaderBytes = 6;
    constexpr std::int64_t kEntryBytes = 16;
    TZmByteReader header = source.Header(kHeaderBytes);
    const std::uint16_t reserved = header.U16LE();
    const std::uint16_t type = header.U16LE();
    const std::uint16_t count = header.U16LE();
    if (source.Size() < 23 || header.HasFailed() || reserved != 0 || type != type_word ||
        count == 0) {
        return false;
    }
    for (std::int64_t i = 0; i < count; ++i) {
        const std::int64_t place = kHeaderBytes + i * kEntryBytes;
        TZmByteReader entry(source.BytesAt(place, kEntryBytes));
        entry.Skip(3);
        const std::uint8_t entry_reserved = entry.U8();
        entry.Skip(4);
        const std::uint32_t image_bytes = entry.U32LE();
        const std::uint32_t image_offset = entry.U32LE();
        if (entry.HasFailed() || entry_reserved != 0 || image_bytes == 0 ||
            image_offset < place + kEntryBytes) {
            return false;
        }
    }
    return true;
}

bool IsTGA(TDetectSource& source) {
    TZmByteReader header = source.Header(18);
    header.Skip(1);
    const std::uint8_t color_map_type = header.U8();
    const std::uint8_t image_type = header.U8();
    header.Skip(9);
    const std::uint16_t width = header.U16LE();
    const std::uint16_t height = header.U16LE();
    const std::uint8_t depth = header.U8();
    const bool known_type =
        (image_type >= 1 && image_type <= 3) || (image_type >= 9 && image_type <= 11);
    const bool known_depth =
        depth == 1 || depth == 4 || (depth % 8 == 0 && depth / 8 >= 1 && depth / 8 <= 4);
    if (header.HasFailed() || !known_type || !known_depth || color_map_type >= 2 || width == 0 ||
        height == 0) {
        return false;
    }
    const std::span<const std::uint8_t> start = source.BytesAt(0, 3);
    if (start[0] == 'P' && start[1] >= '2' && start[1] <= '6') {
        // Required: the sense stands as it always did; a pixmap-like third byte passes.
        return start[2] == ' ' || start[2] == '#' || start[2] == '\n';
    }
    return true;
}

namespace {

/// Tokens of a portable pixmap's header.
class TPixmapTokens {
public:
    explicit TPixmapTokens(TDetectSource& source) : source_(source) {}

    /// The next token that is no comment; nothing at the end of the bytes or of the patience.
    std::optional<std::string> Next() {
        while (tokens_ < kMostTokens) {
            ++tokens_;
            bool is_comment = false;
            std::optional<std::string> token = ReadToken(is_comment);
            if (!token || !is_comment) {
                return token;
            }
        }
        return std::nullopt;
    }
    /// From now on the file is known to be a pixmap and may be read further.
    void LookFurther() { limit_ = kFarLimit; }

private:
    static constexpr int kMostTokens = 501;
    // A file that is no pixmap is given up after one window; a pixmap's comments may be long.
    static constexpr std::int64_t kNearLimit = TDetectSource::kWindowBytes;
    static constexpr std::int64_t kFarLimit = std::int64_t{1} << 20;
    static constexpr std::size_t kLongestToken = 32;

    std::int32_t NextByte() { return offset_ < limit_ ? source_.ByteAt(offset_++) : -1; }

    static bool IsTokenByte(std::int32_t byte) {
        return (byte >= '0' && byte <= '9') || (byte >= 'a' && byte <= 'z') ||
               (byte >= 'A' && byte <= 'Z');
    }

    std::optional<std::string> ReadToken(bool& is_comment) {
        std::int32_t byte = NextByte();
        while (byte >= 0 && !IsTokenByte(byte)) {
            if (byte == '#') {
                is_comment = true;
                return SkipLine();
            }
            byte = NextByte();
        }
        if (byte < 0) {
            return std::nullopt;
        }
        std::string token;
        for (; IsTokenByte(byte); byte = NextByte()) {
            if (token.size() < kLongestToken) {
                token.push_back(static_cast<char>(byte));
            }
        }
        return token;
    }

    std::optional<std::string> SkipLine() {
        std::int32_t byte = NextByte();
        while (byte >= 0 && byte != '\r' && byte != '\n') {
            byte = NextByte();
        }
        return std::string();
    }

    TDetectSource& source_;
    std::int64_t offset_ = 0;
    std::int64_t limit_ = kNearLimit;
    int tokens_ = 0;
};

std::int32_t PixmapNumber(TPixmapTokens& tokens) {
    const std::optional<std::string> token = tokens.Next();
    if (!token) {
        return 0;
    }
    return ParseInteger(*token).value_or(-1);
}

}  // namespace

bool IsPXM(TDetectSource& source) {
    TPixmapTokens tokens(source);
    const std::optional<std::string> magic = tokens.Next();
    if (!magic || magic->size() != 2 || (*magic)[0] != 'P' || (*magic)[1] < '1' ||
        (*magic)[1] > '6') {
        return false;
    }
    tokens.LookFurther();
    const std::int32_t width = PixmapNumber(tokens);
    const std::int32_t height = PixmapNumber(tokens);
    return width >= 1 && height > 0;
}

bool IsJP2(TDetectSource& source) {
    TZmByteReader header = source.Header(12);
    const std::uint32_t length = header.U32BE();
    const std::uint32_t box = header.U32BE();
    return length == 12 && box == 0x6A502020 && header.U32BE() == 0x0D0A870A;
}

bool IsJ2K(TDetectSource& source) {
    TZmByteReader header = source.Header(4);
    const std::uint16_t start_of_codestream = header.U16BE();
    return start_of_codestream == 65359 && header.U16BE() == 65361;
}

bool IsAVI(TDetectSource& source) {
    return StartsWith(source.BytesAt(0, 4), "RIFF") && StartsWith(source.BytesAt(8, 4), "AVI ");
}

bool IsDCX(TDetectSource& source) {
    constexpr int kMostPages = 1024;
    if (source.Header(4).U32LE() != 0x3ADE68B1) {
        return false;
    }
    for (int page = 0; page < kMostPages; ++page) {
        TZmByteReader entry(source.BytesAt(4 + std::int64_t{page} * 4, 4));
        const std::uint32_t offset = entry.U32LE();
        if (entry.HasFailed() || offset >= source.Size()) {
            return false;
        }
        if (offset == 0) {
            break;
        }
    }
    return true;
}

bool IsWMF(TDetectSource& source) {
    constexpr std::int64_t kPlaceableHeaderBytes = 22;
    TZmByteReader start = source.Header(20);
    const std::uint32_t key = start.U32LE();
    if (start.HasFailed()) {
        return false;
    }
    TZmByteReader header(source.BytesAt(key == 0x9AC6CDD7 ? kPlaceableHeaderBytes : 0, 18));
    const std::uint16_t type = header.U16LE();
    const std::uint16_t header_words = header.U16LE();
    header.Skip(12);
    const std::uint16_t parameters = header.U16LE();
    return !header.HasFailed() && type == 1 && header_words == 9 && parameters == 0;
}

bool IsEMF(TDetectSource& source) {
    TZmByteReader header = source.Header(108);
    const std::uint32_t type = header.U32LE();
    header.Skip(36);
    return type == 1 && header.U32LE() == 0x464D4520;
}

bool IsPSD(TDetectSource& source) {
    if (!StartsWith(source.BytesAt(0, 26), "8BPS")) {
        return false;
    }
    TZmByteReader header = source.Header(26);
    header.Skip(4);
    const std::uint16_t version = header.U16BE();
    header.Skip(6);
    const std::uint16_t channels = header.U16BE();
    header.Skip(8);
    const std::uint16_t depth = header.U16BE();
    const std::uint16_t mode = header.U16BE();
    return !header.HasFailed() && (version == 1 || version == 2) && channels > 0 && channels < 25 &&
           depth > 0 && depth < 17 && mode <= 9;
}

bool IsVectorObjects(TDetectSource& source, std::int64_t offset) {
    const std::span<const std::uint8_t> bytes = source.BytesAt(offset, 4);
    return bytes.size() == 4 && StartsWith(bytes, "ZMV") && bytes[3] >= 49 && bytes[3] <= 87;
}

bool IsLayers(TDetectSource& source, std::int64_t offset) {
    const std::span<const std::uint8_t> bytes = source.BytesAt(offset, 25);
    if (bytes.size() < 25 || !StartsWith(bytes, "ZALMOIOLAYERS")) {
        return false;
    }
    TZmByteReader reader(bytes);
    reader.Skip(13);
    return reader.S32LE() > 0;
}

bool IsLayersAndVectors(TDetectSource& source) {
    constexpr std::int64_t kOffsetBytes = 4;
    TZmByteReader header = source.Header(kOffsetBytes);
    const std::int32_t vectors_offset = header.S32LE();
    return !header.HasFailed() && vectors_offset <= source.Size() &&
           IsLayers(source, kOffsetBytes) && IsVectorObjects(source, vectors_offset);
}

bool HasRawSignature(TDetectSource& source) {
    if (source.Size() < 17) {
        return false;
    }
    const std::span<const std::uint8_t> bytes = source.BytesAt(0, 16);
    if (bytes.size() < 16) {
        return false;
    }
    if (StartsWith(bytes, "FUJIFILM") || StartsWith(bytes.subspan(1), "MRM")) {
        return true;
    }
    if (!IsByteOrderMark(bytes)) {
        return false;
    }
    const std::span<const std::uint8_t> mark = bytes.subspan(2);
    return StartsWith(mark, "RO") || StartsWith(mark, "OR") || StartsWith(mark, "RS") ||
           StartsWith(bytes.subspan(8), "CR") ||
           (bytes[6] == 'H' && StartsWith(bytes.subspan(11), "CDR"));
}

std::int32_t FindJPEGStart(TDetectSource& source) {
    constexpr std::int32_t kPositions = 150;
    for (std::int32_t offset = 0; offset < kPositions; ++offset) {
        if (StartsWith(source.BytesAt(offset, 3), "\xFF\xD8\xFF")) {
            return offset;
        }
    }
    return -1;
}

}  // namespace zm
