#include <algorithm>
#include <array>
#include <optional>

#include "engine/io/zmformatdetect_tests_p.h"

// Tests that look into the first directory of a TIFF-like file (TIFF 6.0 section 2; BigTIFF has
// wider fields). The directory may lie anywhere and claim anything: entries are looked at one by
// one where they lie, and none is kept.
namespace zm {

namespace {

constexpr std::uint16_t kLittleEndianMark = 0x4949;
constexpr std::uint16_t kBigEndianMark = 0x4D4D;
constexpr std::uint16_t kBigTiffVersion = 43;

constexpr std::uint16_t kTypeByte = 1;
constexpr std::uint16_t kTypeShort = 3;

constexpr std::uint16_t kTagImageWidth = 256;
constexpr std::uint16_t kTagImageHeight = 257;
constexpr std::uint16_t kTagPhotometric = 262;
constexpr std::uint16_t kTagSubDirectories = 330;
constexpr std::uint16_t kTagStandardId = 37398;
constexpr std::uint16_t kTagRawVersion = 50706;
constexpr std::int64_t kPhotometricFilterArray = 32803;
constexpr std::int64_t kPhotometricLinearRaw = 34892;

// There are no more numbers for tags. What a file claims beyond them can only repeat some, of
// which the first ones count, and is not read.
constexpr std::int64_t kMostEntries = 65536;

struct TEntry {
    std::uint16_t type = 0;
    std::uint64_t count = 0;
    std::int64_t value_place = 0;  ///< of the value or of its offset, from the starting position
};

/// The first directory of a file.
class TDirectory {
public:
    TDirectory(TDetectSource& source, bool is_little, bool is_big_tiff, std::uint64_t place);
    /// The first entry of a tag.
    std::optional<TEntry> Find(std::uint16_t tag) const;
    bool Has(std::uint16_t tag) const { return Find(tag).has_value(); }
    /// First value of a tag; 0 for none and for values that are no numbers.
    std::int64_t Integer(std::uint16_t tag) const;

private:
    std::int64_t ValuePlace(const TEntry& entry, std::int64_t value_bytes) const;
    /// A number of 1, 2, 4 or 8 bytes; nothing behind the stream's end.
    std::optional<std::uint64_t> Number(std::int64_t place, std::int64_t bytes) const;

    TDetectSource& source_;
    bool is_little_;
    std::int64_t field_bytes_;  // of counts and offsets
    std::int64_t entry_bytes_;
    std::int64_t first_entry_ = 0;
    std::int64_t entry_count_ = 0;
};

/// Bytes of one value by its type code; 0 for unknown codes.
std::int64_t ValueBytes(std::uint16_t type) {
    constexpr std::array<std::uint8_t, 19> kBytes{0, 1, 1, 2, 4, 8, 1, 1, 2, 4,
                                                  8, 4, 8, 4, 1, 1, 8, 8, 8};
    return type < kBytes.size() ? kBytes[type] : 0;
}

bool IsRational(std::uint16_t type) {
    return type == 5 || type == 10;
}

TDirectory::TDirectory(TDetectSource& source, bool is_little, bool is_big_tiff, std::uint64_t place)
    : source_(source),
      is_little_(is_little),
      field_bytes_(is_big_tiff ? 8 : 4),
      entry_bytes_(is_big_tiff ? 20 : 12) {
    if (place == 0 || place >= static_cast<std::uint64_t>(source.Size())) {
        return;
    }
    const auto start = static_cast<std::int64_t>(place);
    const std::int64_t count_bytes = is_big_tiff ? 8 : 2;
    const std::uint64_t claimed = Number(start, count_bytes).value_or(0);
    first_entry_ = start + count_bytes;
    const std::int64_t fitting = (source.Size() - first_entry_) / entry_bytes_;
    const std::int64_t most = std::min(std::max<std::int64_t>(fitting, 0), kMostEntries);
    entry_count_ = static_cast<std::int64_t>(std::min(claimed, static_cast<std::uint64_t>(most)));
}

std::optional<std::uint64_t> TDirectory::Number(std::int64_t place, std::int64_t bytes) const {
    const std::span<const std::uint8_t> raw = source_.BytesAt(place, bytes);
    if (static_cast<std::int64_t>(raw.size()) < bytes) {
        return std::nullopt;
    }
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < raw.size(); ++i) {
        value = value << 8 | raw[is_little_ ? raw.size() - 1 - i : i];
    }
    return value;
}

std::optional<TEntry> TDirectory::Find(std::uint16_t tag) const {
    for (std::int64_t i = 0; i < entry_count_; ++i) {
        const std::int64_t place = first_entry_ + i * entry_bytes_;
        const auto found = Number(place, 2);
        if (!found) {
            break;
        }
        if (*found == tag) {
            TEntry entry;
            entry.type = static_cast<std::uint16_t>(Number(place + 2, 2).value_or(0));
            entry.count = Number(place + 4, field_bytes_).value_or(0);
            entry.value_place = place + 4 + field_bytes_;
            return entry;
        }
    }
    return std::nullopt;
}

/// Values lie in the entry where they all fit, else at the offset that the entry holds.
std::int64_t TDirectory::ValuePlace(const TEntry& entry, std::int64_t value_bytes) const {
    if (entry.count <= static_cast<std::uint64_t>(field_bytes_ / value_bytes)) {
        return entry.value_place;
    }
    const std::uint64_t offset = Number(entry.value_place, field_bytes_).value_or(0);
    const auto size = static_cast<std::uint64_t>(source_.Size());
    return static_cast<std::int64_t>(std::min(offset, size));
}

std::int64_t TDirectory::Integer(std::uint16_t tag) const {
    const auto entry = Find(tag);
    const std::int64_t value_bytes = entry ? ValueBytes(entry->type) : 0;
    if (value_bytes == 0 || entry->count == 0) {
        return 0;
    }
    const std::int64_t place = ValuePlace(*entry, value_bytes);
    if (IsRational(entry->type)) {
        const std::uint64_t divisor = Number(place + 4, 4).value_or(1);
        return static_cast<std::int64_t>(Number(place, 4).value_or(0) /
                                         std::max<std::uint64_t>(divisor, 1));
    }
    return static_cast<std::int64_t>(Number(place, value_bytes).value_or(0));
}

/// Directory of a header whose version word is not looked at: the classic form.
TDirectory ClassicDirectory(TDetectSource& source, bool is_little) {
    TZmByteReader header = source.Header(8);
    header.Skip(4);
    const std::uint32_t place = is_little ? header.U32LE() : header.U32BE();
    return {source, is_little, /*is_big_tiff=*/false, place};
}

bool HasByteOrderWord(TDetectSource& source, std::uint16_t& mark) {
    mark = source.Header(2).U16LE();
    return mark == kLittleEndianMark || mark == kBigEndianMark;
}

std::uint16_t VersionOf(TDetectSource& source, bool is_little) {
    TZmByteReader header = source.Header(4);
    header.Skip(2);
    return is_little ? header.U16LE() : header.U16BE();
}

/// In BigTIFF the version is followed by the size of offsets, which is 8, a zero word and the
/// offset in 8 bytes.
TDirectory BigTiffDirectory(TDetectSource& source, bool is_little) {
    TZmByteReader header = source.Header(16);
    header.Skip(4);
    const std::uint16_t offset_bytes = is_little ? header.U16LE() : header.U16BE();
    const std::uint16_t zero = header.U16LE();
    const std::uint64_t first = is_little ? header.U32LE() : header.U32BE();
    const std::uint64_t second = is_little ? header.U32LE() : header.U32BE();
    const bool is_valid = offset_bytes == 8 && zero == 0 && !header.HasFailed();
    const std::uint64_t place = is_little ? second << 32 | first : first << 32 | second;
    return {source, is_little, /*is_big_tiff=*/true, is_valid ? place : 0};
}

}  // namespace

bool IsHDPhoto(TDetectSource& source) {
    constexpr std::array<std::uint16_t, 5> kTags{48256, 48257, 48129, 48320, 48321};
    if (source.Size() < 9 || source.Header(2).U16LE() != kLittleEndianMark) {
        return false;
    }
    const TDirectory directory = ClassicDirectory(source, /*is_little=*/true);
    return std::all_of(kTags.begin(), kTags.end(),
                       [&directory](std::uint16_t tag) { return directory.Has(tag); });
}

/// Required: the version word is compared with that of BigTIFF only; files with other numbers than
/// 42 there are read as TIFF.
bool IsTIFF(TDetectSource& source) {
    std::uint16_t mark = 0;
    if (source.Size() < 21 || !HasByteOrderWord(source, mark)) {
        return false;
    }
    const bool is_little = mark == kLittleEndianMark;
    const TDirectory directory = VersionOf(source, is_little) == kBigTiffVersion
                                     ? BigTiffDirectory(source, is_little)
                                     : ClassicDirectory(source, is_little);
    return directory.Has(kTagImageWidth) && directory.Has(kTagImageHeight);
}

/// Raw containers are of the classic form.
bool IsCameraRawTIFF(TDetectSource& source) {
    constexpr std::int64_t kThumbnailSide = 200;
    std::uint16_t mark = 0;
    if (!HasByteOrderWord(source, mark)) {
        return false;
    }
    const bool is_little = mark == kLittleEndianMark;
    if (VersionOf(source, is_little) == kBigTiffVersion) {
        return false;
    }
    const TDirectory directory = ClassicDirectory(source, is_little);
    const auto version = directory.Find(kTagRawVersion);
    if (version && version->type == kTypeByte && version->count == 4) {
        return true;
    }
    const auto photometric = directory.Find(kTagPhotometric);
    if (photometric && photometric->type == kTypeShort && photometric->count == 1) {
        const std::int64_t value = directory.Integer(kTagPhotometric);
        if (value == kPhotometricFilterArray || value == kPhotometricLinearRaw) {
            return true;
        }
    }
    return directory.Has(kTagSubDirectories) && directory.Has(kTagStandardId) &&
           directory.Integer(kTagImageWidth) < kThumbnailSide &&
           directory.Integer(kTagImageHeight) < kThumbnailSide;
}

}  // namespace zm
