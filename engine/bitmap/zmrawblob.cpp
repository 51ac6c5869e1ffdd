/// The raw blob. Reading looks at every field, and at whether the data hold what the fields
/// promise, before anything is allocated; the image is read into a bitmap of its own, so that a
/// failure leaves the old one as it was.

#include "engine/bitmap/zmrawblob.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstring>
#include <limits>
#include <span>
#include <utility>
#include <vector>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams.h"

namespace zm {
namespace {

constexpr std::array<std::uint8_t, kRawMagicBytes> kMagic = {'T', 'Z', 'M', 'B', 'I', 'T',
                                                             'M', 'A', 'P', 'R', 'A', 'W'};
constexpr std::int32_t kMostPaletteEntries = 256;
constexpr std::int32_t kLargestAlignment = 1024;
constexpr std::int32_t kPlaneAlignment = 32;  // of platform bitmaps too
constexpr std::uint8_t kOpaque = 255;

/// The fields between the palette and the rows.
struct TRawFields {
    std::int32_t width = 0;
    std::int32_t height = 0;
    TZmPixelFormat format = zmnull;
    bool is_full = false;
    std::int32_t palette_used = 0;
    double black_value = 0;
    double white_value = 0;
    std::array<std::int32_t, 4> channel_offset{};
    bool enable_channel_offset = false;
    std::int32_t contrast = 0;
    std::int32_t bit_alignment = 0;
};

/// What a blob holds, found before its rows are read. Offsets count from the blob's start.
struct TRawLayout {
    TRawFields fields;
    std::vector<TRGB> palette;
    std::int64_t rows_offset = 0;
    std::int64_t row_bytes = 0;
    bool has_plane = false;
    std::int64_t plane_offset = 0;
    std::int64_t plane_row_bytes = 0;
    bool is_plane_full = false;
};

// Bytes of rows.

/// Bytes of a row that hold pixels.
std::int64_t UsedBytes(std::int32_t width, std::int32_t bit_count) {
    return (std::int64_t{width} * bit_count + 7) / 8;
}

/// The alignment that the blob tells, in bits. The bitmap's own may wait for its next allocation;
/// the rows are written as the field says.
std::int32_t AlignmentOf(TZmBitmap& bitmap) {
    return bitmap.GetLocation() == zmTBitmap ? kPlaneAlignment : bitmap.GetBitAlignment();
}

/// Bytes of a row in the blob; 0 for an empty bitmap.
std::optional<std::int64_t> RowBytesOf(TZmBitmap& bitmap) {
    return bitmap.IsEmpty()
               ? 0
               : CalcRowLen(bitmap.GetWidth(), bitmap.GetBitCount(), AlignmentOf(bitmap));
}

/// Clears the bits behind the last pixel of a row of bits.
void ClearUnusedBits(std::uint8_t* row, std::int64_t bit_count) {
    if (bit_count % 8 != 0) {
        std::uint8_t& last = row[bit_count / 8];
        last = static_cast<std::uint8_t>(last & 0xFF00 >> bit_count % 8);
    }
}

// Writing.

/// Takes bytes one after the other, to a block of memory or a stream.
class TBlobSink {
public:
    TBlobSink(void* buffer, TStream* stream)
        : buffer_(static_cast<std::uint8_t*>(buffer)), stream_(stream) {}

    void Put(std::span<const std::uint8_t> bytes) {
        if (bytes.empty() || failed_) {
            return;
        }
        if (buffer_ != nullptr) {
            std::memcpy(buffer_, bytes.data(), bytes.size());
            buffer_ += bytes.size();
            return;
        }
        const auto count = static_cast<std::int32_t>(bytes.size());
        failed_ = stream_->Write(bytes.data(), count) != count;
    }
    void PutByte(std::uint8_t value) { Put({&value, 1}); }
    void Put32(std::int32_t value) {
        std::array<std::uint8_t, 4> bytes{};
        PutU32LE(bytes.data(), static_cast<std::uint32_t>(value));
        Put(bytes);
    }
    void PutDouble(double value) {
        const auto bits = std::bit_cast<std::uint64_t>(value);
        Put32(static_cast<std::int32_t>(static_cast<std::uint32_t>(bits)));
        Put32(static_cast<std::int32_t>(static_cast<std::uint32_t>(bits >> 32)));
    }
    bool HasFailed() const { return failed_; }

private:
    std::uint8_t* buffer_;
    TStream* stream_;
    bool failed_ = false;
};

void PutRows(TZmBitmap& bitmap, TBlobSink& sink) {
    const std::int32_t width = bitmap.GetWidth();
    std::vector<std::uint8_t> row(static_cast<std::size_t>(RowBytesOf(bitmap).value_or(0)));
    const std::int64_t used_bytes = UsedBytes(width, bitmap.GetBitCount());
    for (std::int32_t y = 0; y < bitmap.GetHeight() && !sink.HasFailed(); ++y) {
        const std::uint8_t* const from = bitmap.GetScanLine(y);
        if (from != nullptr) {
            std::memcpy(row.data(), from, static_cast<std::size_t>(used_bytes));
            ClearUnusedBits(row.data(), std::int64_t{width} * bitmap.GetBitCount());
        }
        sink.Put(row);
    }
}

/// The plane in the size of its image; where it has no pixels, they are opaque.
void PutPlane(TZmBitmap& plane, std::int32_t width, std::int32_t height, std::int64_t row_bytes,
              TBlobSink& sink) {
    const bool is_readable = plane.GetPixelFormat() == zm8g && !plane.IsEmpty();
    const std::int32_t covered = is_readable ? std::min(width, plane.GetWidth()) : 0;
    std::vector<std::uint8_t> row(static_cast<std::size_t>(row_bytes), 0);
    for (std::int32_t y = 0; y < height && !sink.HasFailed(); ++y) {
        std::fill_n(row.begin(), width, kOpaque);
        if (covered > 0 && y < plane.GetHeight()) {
            std::memcpy(row.data(), plane.GetScanLine(y), static_cast<std::size_t>(covered));
        }
        sink.Put(row);
    }
    sink.PutByte(plane.GetFull() ? 1 : 0);
}

// Reading.

/// All of `count` bytes; streams may give less than was asked for before their end.
bool ReadFully(TStream& stream, void* target, std::int64_t count) {
    auto* bytes = static_cast<std::uint8_t*>(target);
    while (count > 0) {
        const std::int32_t got = stream.Read(bytes, SaturateToInt32(count));
        if (got <= 0) {
            return false;
        }
        bytes += got;
        count -= got;
    }
    return true;
}

/// A flag byte; anything but 0 and 1 clears `is_valid`.
bool ReadFlag(TZmByteReader& reader, bool& is_valid) {
    const std::uint8_t value = reader.U8();
    is_valid = is_valid && value <= 1;
    return value == 1;
}

double ReadDouble(TZmByteReader& reader) {
    const std::uint64_t low = reader.U32LE();
    const std::uint64_t high = reader.U32LE();
    return std::bit_cast<double>(high << 32 | low);
}

/// Nothing for values that no bitmap has.
std::optional<TRawFields> ParseFields(std::span<const std::uint8_t> bytes) {
    TZmByteReader reader(bytes);
    TRawFields fields;
    bool is_valid = true;
    fields.width = reader.S32LE();
    fields.height = reader.S32LE();
    fields.format = static_cast<TZmPixelFormat>(reader.U8());
    fields.is_full = ReadFlag(reader, is_valid);
    fields.palette_used = reader.S32LE();
    fields.black_value = ReadDouble(reader);
    fields.white_value = ReadDouble(reader);
    for (std::int32_t& offset : fields.channel_offset) {
        offset = reader.S32LE();
    }
    fields.enable_channel_offset = ReadFlag(reader, is_valid);
    fields.contrast = reader.S32LE();
    fields.bit_alignment = reader.S32LE();
    const auto alignment = static_cast<std::uint32_t>(fields.bit_alignment);
    is_valid = is_valid && !reader.HasFailed() && fields.width > 0 && fields.height > 0 &&
               IsImageFormat(fields.format) && fields.palette_used >= 0 &&
               fields.palette_used <= kMostPaletteEntries && std::isfinite(fields.black_value) &&
               std::isfinite(fields.white_value) && std::has_single_bit(alignment) &&
               alignment >= 8 && alignment <= kLargestAlignment;
    return is_valid ? std::optional(fields) : std::nullopt;
}

/// Magic, version, palette and fields, from the stream's position on.
bool ReadHead(TStream& stream, std::int64_t blob_bytes, TRawLayout& layout) {
    std::array<std::uint8_t, kRawHeadBytes> head{};
    if (!ReadFully(stream, head.data(), kRawHeadBytes) ||
        !std::equal(kMagic.begin(), kMagic.end(), head.begin())) {
        return false;
    }
    TZmByteReader reader(head);
    reader.Skip(kRawMagicBytes);
    const std::int32_t version = reader.S32LE();
    const std::int32_t palette_count = reader.S32LE();
    if (version < 0 || palette_count < 0 || palette_count > kMostPaletteEntries) {
        return false;
    }
    const std::int64_t palette_bytes = std::int64_t{palette_count} * 3;
    layout.rows_offset = std::int64_t{kRawHeadBytes} + palette_bytes + kRawFieldsBytes;
    if (layout.rows_offset > blob_bytes) {
        return false;
    }
    layout.palette.resize(static_cast<std::size_t>(palette_count));
    std::array<std::uint8_t, kRawFieldsBytes> field_bytes{};
    if (!ReadFully(stream, layout.palette.data(), palette_bytes) ||
        !ReadFully(stream, field_bytes.data(), kRawFieldsBytes)) {
        return false;
    }
    const auto fields = ParseFields(field_bytes);
    layout.fields = fields.value_or(TRawFields{});
    return fields.has_value();
}

/// The byte at an offset, which has to be a flag.
bool ReadFlagAt(TStream& stream, std::int64_t position, bool& flag) {
    std::uint8_t value = 0;
    stream.SetPosition(position);
    if (!ReadFully(stream, &value, 1) || value > 1) {
        return false;
    }
    flag = value == 1;
    return true;
}

/// Where the rows and the plane lie, all within the blob's bytes.
bool FindRows(TStream& stream, std::int64_t start, std::int64_t blob_bytes, TRawLayout& layout) {
    const TRawFields& fields = layout.fields;
    const auto row_bytes =
        CalcRowLen(fields.width, PixelFormatInfo(fields.format).bit_count, fields.bit_alignment);
    const auto plane_row_bytes = CalcRowLen(fields.width, 8, kPlaneAlignment);
    // A product of two 31-bit numbers: it cannot overflow.
    if (!row_bytes || !plane_row_bytes ||
        *row_bytes * fields.height >= blob_bytes - layout.rows_offset) {
        return false;
    }
    layout.row_bytes = *row_bytes;
    layout.plane_row_bytes = *plane_row_bytes;
    const std::int64_t flag_offset = layout.rows_offset + *row_bytes * fields.height;
    if (!ReadFlagAt(stream, start + flag_offset, layout.has_plane)) {
        return false;
    }
    layout.plane_offset = flag_offset + 1;
    const std::int64_t plane_bytes = *plane_row_bytes * fields.height;
    return !layout.has_plane ||
           (plane_bytes < blob_bytes - layout.plane_offset &&
            ReadFlagAt(stream, start + layout.plane_offset + plane_bytes, layout.is_plane_full));
}

bool ReadRows(TStream& stream, std::int64_t position, TZmBitmap& bitmap) {
    stream.SetPosition(position);
    try {
        for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
            std::uint8_t* const row = bitmap.GetScanLine(y);
            if (row == nullptr || !ReadFully(stream, row, bitmap.GetRowLen())) {
                return false;
            }
        }
    } catch (const EZmException&) {
        return false;  // a row on disk that the system cannot map
    }
    return true;
}

/// What the fields tell about an allocated bitmap.
void ApplyFields(const TRawLayout& layout, TZmBitmap& bitmap) {
    const TRawFields& fields = layout.fields;
    bitmap.SetPaletteUsed(fields.palette_used);
    bitmap.SetFull(fields.is_full);
    bitmap.SetBlackValue(fields.black_value);
    bitmap.SetWhiteValue(fields.white_value);
    for (std::size_t i = 0; i < fields.channel_offset.size(); ++i) {
        bitmap.SetChannelOffset(i, fields.channel_offset[i]);
    }
    bitmap.SetEnableChannelOffset(fields.enable_channel_offset);
    bitmap.SetContrast(fields.contrast);
}

/// Reads the whole blob at `start` into an empty bitmap.
bool ReadBlob(TStream& stream, std::int64_t start, TRawLayout& layout, TZmBitmap& bitmap) {
    const std::int64_t blob_bytes = stream.GetSize() - start;
    if (!ReadHead(stream, blob_bytes, layout) || !FindRows(stream, start, blob_bytes, layout)) {
        return false;
    }
    const TRawFields& fields = layout.fields;
    bitmap.SetBitAlignment(fields.bit_alignment);
    if (!bitmap.Allocate(fields.width, fields.height, fields.format) ||
        !ReadRows(stream, start + layout.rows_offset, bitmap)) {
        return false;
    }
    ApplyFields(layout, bitmap);
    if (!layout.has_plane) {
        return true;
    }
    TZmBitmap* const plane = bitmap.GetAlphaChannel();
    if (plane == nullptr || plane->GetRowLen() != layout.plane_row_bytes ||
        !ReadRows(stream, start + layout.plane_offset, *plane)) {
        return false;
    }
    plane->SetFull(layout.is_plane_full);
    return true;
}

/// Position behind the blob.
std::int64_t EndOf(const TRawLayout& layout) {
    return layout.plane_offset +
           (layout.has_plane ? layout.plane_row_bytes * layout.fields.height + 1 : 0);
}

}  // namespace

std::optional<std::int64_t> CalcRawBlobBytes(TZmBitmap& bitmap) {
    const auto palette_bytes = std::int64_t{bitmap.GetPaletteLen()} * 3;
    std::int64_t bytes = std::int64_t{kRawHeadBytes + kRawFieldsBytes} + palette_bytes + 1;
    const auto row_bytes = RowBytesOf(bitmap);
    const auto plane_row_bytes = CalcRowLen(bitmap.GetWidth(), 8, kPlaneAlignment);
    if (!row_bytes || !plane_row_bytes) {
        return std::nullopt;
    }
    bytes += *row_bytes * bitmap.GetHeight();
    if (bitmap.GetAlphaChannelRaw() != nullptr) {
        bytes += 1 + *plane_row_bytes * bitmap.GetHeight();
    }
    return bytes;
}

std::int32_t TZmBitmap::CalcRAWSize() {
    const auto bytes = CalcRawBlobBytes(*this);
    return bytes && *bytes <= kMaxInt32 ? static_cast<std::int32_t>(*bytes) : -1;
}

bool TZmBitmap::SaveRAWToBufferOrStream(void* Buffer, std::int64_t buffer_bytes, TStream* Stream,
                                        bool /*StreamHasSize*/) {
    const auto blob_bytes = CalcRawBlobBytes(*this);
    if (!blob_bytes || (Buffer != nullptr ? buffer_bytes < *blob_bytes : Stream == nullptr)) {
        return false;
    }
    TBlobSink sink(Buffer, Stream);
    sink.Put(kMagic);
    sink.Put32(0);
    sink.Put32(GetPaletteLen());
    sink.Put({reinterpret_cast<const std::uint8_t*>(fRGBPalette.data()),
              fRGBPalette.size() * sizeof(TRGB)});
    sink.Put32(fWidth);
    sink.Put32(fHeight);
    sink.PutByte(fPixelFormat);
    sink.PutByte(fFull ? 1 : 0);
    sink.Put32(fPaletteUsed);
    sink.PutDouble(fBlackValue);
    sink.PutDouble(fWhiteValue);
    for (const std::int32_t offset : fChannelOffset) {
        sink.Put32(offset);
    }
    sink.PutByte(fEnableChannelOffset ? 1 : 0);
    sink.Put32(fContrast);
    sink.Put32(AlignmentOf(*this));
    PutRows(*this, sink);
    sink.PutByte(fAlphaChannel != nullptr ? 1 : 0);
    if (fAlphaChannel != nullptr) {
        PutPlane(*fAlphaChannel, fWidth, fHeight,
                 CalcRowLen(fWidth, 8, kPlaneAlignment).value_or(0), sink);
    }
    return !sink.HasFailed();
}

bool TZmBitmap::LoadRAWFromBufferOrStream(const void* Buffer, std::int64_t buffer_bytes,
                                          TStream* Stream) {
    TBorrowedMemoryStream memory(Buffer, std::max<std::int64_t>(buffer_bytes, 0));
    TStream* const stream = Buffer != nullptr ? &memory : Stream;
    if (stream == nullptr || fIsVirtual) {
        return false;
    }
    const std::int64_t start = stream->GetPosition();
    TRawLayout layout;
    TZmBitmap loaded;
    loaded.fMinFileSize = fMinFileSize;
    loaded.fMemoryAllocator = fMemoryAllocator;
    loaded.fOrigin = fOrigin;
    bool is_loaded = ReadBlob(*stream, start, layout, loaded);
    if (is_loaded && !layout.palette.empty()) {
        // Greys can carry a palette too; colours by index always have all entries.
        const std::size_t count = std::max(layout.palette.size(), loaded.fRGBPalette.size());
        loaded.fRGBPalette = std::move(layout.palette);
        loaded.fRGBPalette.resize(count);
    }
    is_loaded = is_loaded && TakeRaw(loaded);
    if (!is_loaded) {
        stream->SetPosition(start);
        return false;
    }
    stream->SetPosition(start + EndOf(layout));
    return true;
}

/// The image and its description from a bitmap that a blob was read into; only a platform bitmap
/// can refuse it.
bool TZmBitmap::TakeRaw(TZmBitmap& loaded) {
    if (fLocation == zmTBitmap) {
        constexpr TZmPixelFormatSet kHeld(zm1g, zm8p, zm8g, zm16g, zm24RGB, zm32RGB);
        const bool is_held = kHeld.Contains(loaded.fPixelFormat);
        if (!is_held || (loaded.fPixelFormat == zm16g && !loaded.SetPixelFormat(zm8g))) {
            return false;
        }
    }
    if (fIsAlpha) {
        loaded.fAlphaChannel.reset();
    }
    const bool is_full = loaded.fFull;
    const std::int32_t palette_used = loaded.fPaletteUsed;
    fBlackValue = loaded.fBlackValue;
    fWhiteValue = loaded.fWhiteValue;
    fChannelOffset = loaded.fChannelOffset;
    fEnableChannelOffset = loaded.fEnableChannelOffset;
    fContrast = loaded.fContrast;
    SetBitAlignment(loaded.fBitAlignment);
    fModified = false;
    if (!TakeCropped(loaded)) {
        return false;
    }
    fPaletteUsed = palette_used;
    fFull = is_full;
    return true;
}

}  // namespace zm
