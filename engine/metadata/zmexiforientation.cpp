// The one entry of an EXIF block that decides how the pixels are to be shown (EXIF 2.32, 4.6.4;
// TIFF 6.0 section 2 for the structure). Both byte orders.

#include "engine/metadata/zmexiforientation.h"

#include <optional>

#include "engine/foundation/zmbytereader.h"

namespace zm {

namespace {

constexpr std::uint16_t kLittleEndianMark = 0x4949;
constexpr std::uint16_t kBigEndianMark = 0x4D4D;
constexpr std::uint16_t kTiffMagic = 42;
constexpr std::uint16_t kOrientationTag = 0x0112;
constexpr std::uint16_t kTypeShort = 3;
constexpr std::size_t kEntryBytes = 12;
constexpr std::size_t kTagAndTypeBytes = 4;

/// Where the value lies and how it is stored.
struct TOrientationPlace {
    std::size_t offset;
    bool is_big_endian;
    std::uint16_t value;
};

class TBlockReader {
public:
    explicit TBlockReader(std::span<const std::uint8_t> block) : bytes_(block) {}

    std::optional<TOrientationPlace> Find();

private:
    std::uint16_t U16() { return is_big_endian_ ? bytes_.U16BE() : bytes_.U16LE(); }
    std::uint32_t U32() { return is_big_endian_ ? bytes_.U32BE() : bytes_.U32LE(); }
    bool MoveToDirectory();

    TZmByteReader bytes_;
    bool is_big_endian_ = false;
};

bool TBlockReader::MoveToDirectory() {
    const std::uint16_t mark = bytes_.U16LE();
    is_big_endian_ = mark == kBigEndianMark;
    if ((mark != kLittleEndianMark && mark != kBigEndianMark) || U16() != kTiffMagic) {
        return false;
    }
    bytes_.MoveTo(U32());
    return !bytes_.HasFailed();
}

std::optional<TOrientationPlace> TBlockReader::Find() {
    if (!MoveToDirectory()) {
        return std::nullopt;
    }
    const std::uint16_t entries = U16();
    for (std::uint16_t i = 0; i < entries && bytes_.Remaining() >= kEntryBytes; ++i) {
        const std::uint16_t tag = U16();
        const std::uint16_t type = U16();
        if (tag != kOrientationTag) {
            bytes_.Skip(kEntryBytes - kTagAndTypeBytes);
            continue;
        }
        const std::uint32_t count = U32();
        const std::size_t offset = bytes_.Position();
        const std::uint16_t value = U16();
        const bool is_usable = type == kTypeShort && count == 1 && value >= kOrientationUpright &&
                               value <= kOrientationLast;
        return is_usable ? std::optional(TOrientationPlace{offset, is_big_endian_, value})
                         : std::nullopt;
    }
    return std::nullopt;
}

}  // namespace

std::int32_t ReadExifOrientation(std::span<const std::uint8_t> block) {
    const auto place = TBlockReader(block).Find();
    return place ? place->value : 0;
}

bool SetExifOrientation(std::span<std::uint8_t> block, std::int32_t orientation) {
    const auto place = TBlockReader(block).Find();
    if (!place) {
        return false;
    }
    const auto value = static_cast<std::uint8_t>(orientation);
    block[place->offset] = place->is_big_endian ? std::uint8_t{0} : value;
    block[place->offset + 1] = place->is_big_endian ? value : std::uint8_t{0};
    return true;
}

}  // namespace zm
