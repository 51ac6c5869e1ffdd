#include <cmath>
#include <new>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/linux/drawing_metafile_p.h"

namespace zm::platform {
namespace {

constexpr std::size_t kRecordStart = 8;   ///< type and size
constexpr std::size_t kHeaderBytes = 88;  ///< without the extensions
constexpr std::uint32_t kSignature = 0x464D4520;
constexpr std::uint32_t kExtendedSignature = 0x2B464D45;
enum TRecordType : std::uint32_t { rtHeader = 1, rtEnd = 14, rtComment = 70 };
constexpr std::int32_t kPlainType = 3;
constexpr std::int32_t kExtendedAlone = 4;
constexpr std::int32_t kExtendedDual = 5;
constexpr double kMillimetresPerInch = 25.4;
constexpr double kFrameUnitsPerMillimetre = 100;

TRect ReadRect(TZmByteReader& reader) {
    const std::int32_t left = reader.S32LE();
    const std::int32_t top = reader.S32LE();
    const std::int32_t right = reader.S32LE();
    return {left, top, right, reader.S32LE()};
}

}  // namespace

std::unique_ptr<TLinuxMetafile> TLinuxMetafile::Create(std::span<const std::uint8_t> bytes) {
    auto metafile = std::make_unique<TLinuxMetafile>();
    metafile->bytes_.assign(bytes.begin(), bytes.end());
    return metafile->ReadHeader() && metafile->CheckRecords() ? std::move(metafile) : nullptr;
}

bool TLinuxMetafile::ReadHeader() {
    TZmByteReader reader(bytes_);
    const bool is_header = reader.U32LE() == rtHeader;
    const std::uint32_t header_bytes = reader.U32LE();
    ReadRect(reader);  // the bounds of what is drawn; the frame is what counts
    header_.frame = ReadRect(reader);
    const bool is_signed = reader.U32LE() == kSignature;
    header_.version = reader.U32LE();
    header_.size_bytes = reader.U32LE();
    reader.Skip(4);
    handle_count_ = reader.U16LE();
    reader.MoveTo(72);
    const double device_x = reader.S32LE();
    const double device_y = reader.S32LE();
    const double millimetres_x = reader.S32LE();
    const double millimetres_y = reader.S32LE();
    if (!is_header || !is_signed || reader.HasFailed() || header_bytes < kHeaderBytes ||
        header_.size_bytes > bytes_.size() || device_x < 1 || device_y < 1 || millimetres_x < 1 ||
        millimetres_y < 1) {
        return false;
    }
    pixels_per_mm_x_ = device_x / millimetres_x;
    pixels_per_mm_y_ = device_y / millimetres_y;
    header_.type = kPlainType;
    header_.dpi_x = static_cast<float>(pixels_per_mm_x_ * kMillimetresPerInch);
    header_.dpi_y = static_cast<float>(pixels_per_mm_y_ * kMillimetresPerInch);
    const double unit_x = pixels_per_mm_x_ / kFrameUnitsPerMillimetre;
    const double unit_y = pixels_per_mm_y_ / kFrameUnitsPerMillimetre;
    const TRect& frame = header_.frame;
    header_.x = RoundHalfEven(frame.left * unit_x);
    header_.y = RoundHalfEven(frame.top * unit_y);
    header_.width = RoundHalfEven((static_cast<double>(frame.right) - frame.left) * unit_x);
    header_.height = RoundHalfEven((static_cast<double>(frame.bottom) - frame.top) * unit_y);
    return true;
}

std::optional<TLinuxMetafile::TRecord> TLinuxMetafile::NextRecord(std::size_t& place) const {
    TZmByteReader reader(bytes_);
    reader.MoveTo(place);
    const std::uint32_t type = reader.U32LE();
    const std::size_t size = reader.U32LE();
    if (reader.HasFailed() || size < kRecordStart || size % 4 != 0 ||
        size > bytes_.size() - place) {
        return std::nullopt;
    }
    const TRecord record{type, std::span(bytes_).subspan(place, size)};
    place += size;
    return record;
}

bool TLinuxMetafile::CheckRecords() {
    std::size_t place = 0;
    while (const auto record = NextRecord(place)) {
        if (record->type == rtEnd) {
            return true;
        }
        if (record->type == rtComment && header_.type == kPlainType) {
            FindExtendedType(*record);
        }
    }
    return false;
}

/// The first comment of an extended metafile holds its header, which tells whether plain records
/// stand beside the others.
void TLinuxMetafile::FindExtendedType(const TRecord& record) {
    TZmByteReader reader(record.bytes);
    reader.Skip(kRecordStart + 4);
    const bool is_extended = reader.U32LE() == kExtendedSignature;
    reader.Skip(2);
    const bool is_dual = (reader.U16LE() & 1) != 0;
    if (is_extended && !reader.HasFailed()) {
        header_.type = is_dual ? kExtendedDual : kExtendedAlone;
    }
}

std::unique_ptr<TDrawMetafile> CreateMetafile(std::span<const std::uint8_t> bytes) try {
    return IsVectorGraphicsBound() ? TLinuxMetafile::Create(bytes) : nullptr;
} catch (const std::bad_alloc&) {
    return nullptr;
}

bool TLinuxGraphics::DrawMetafile(const TDrawMetafile& metafile, const TDrawRect& rect) {
    const auto& records = static_cast<const TLinuxMetafile&>(metafile);
    const TRect frame = records.Header().frame;
    const double width = (static_cast<double>(frame.right) - frame.left) *
                         records.PixelsPerMillimetreX() / kFrameUnitsPerMillimetre;
    const double height = (static_cast<double>(frame.bottom) - frame.top) *
                          records.PixelsPerMillimetreY() / kFrameUnitsPerMillimetre;
    const double scale_x = rect.width / width;
    const double scale_y = rect.height / height;
    const double left = frame.left * records.PixelsPerMillimetreX() / kFrameUnitsPerMillimetre;
    const double top = frame.top * records.PixelsPerMillimetreY() / kFrameUnitsPerMillimetre;
    const TDeviceMatrix to_target =
        world_.After({scale_x, 0, 0, scale_y, rect.x - left * scale_x, rect.y - top * scale_y});
    if (width <= 0 || height <= 0 || !to_target.IsFinite()) {
        return false;
    }
    if (rect.width == 0 || rect.height == 0) {
        return true;  // nothing of it can be seen
    }
    const TDeviceMatrix kept_world = world_;
    const auto kept_clip = clip_;
    bool is_played = true;
    try {
        TMetafilePlayer(*this, records, to_target).Play();
    } catch (const std::bad_alloc&) {
        is_played = false;
    }
    world_ = kept_world;
    clip_ = kept_clip;
    return is_played;
}

}  // namespace zm::platform
