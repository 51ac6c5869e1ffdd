/// Device-independent bitmaps in memory, both ways. What comes from outside is not trusted: sizes,
/// colour table and rows have to lie within the bytes at hand before anything is allocated.

#include "engine/bitmap/zmdib.h"

#include <algorithm>
#include <bit>
#include <cstring>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::uint32_t kCoreHeaderBytes = 12;
constexpr std::uint32_t kOs2HeaderBytes = 64;
constexpr std::uint32_t kHeaderWithAlphaBytes = 56;
constexpr std::uint32_t kNoCompression = 0;
constexpr std::uint32_t kBitFields = 3;
constexpr std::int32_t kAlignmentBits = 32;
constexpr std::int64_t kMostPixelBytes = kMaxInt32 - std::int64_t{2048};  // headers fit beside
constexpr std::array<std::uint32_t, 4> kMasks555 = {0x7C00, 0x03E0, 0x001F, 0};
constexpr std::array<std::uint32_t, 4> kMasks888 = {0xFF0000, 0xFF00, 0xFF, 0};
constexpr TRGB kBlack{};
constexpr TRGB kWhite{255, 255, 255};

// Reading.

bool IsDepth(std::int32_t bit_count, std::uint32_t compression) {
    switch (bit_count) {
        case 1:
        case 4:
        case 8:
        case 24: return compression == kNoCompression;
        case 16:
        case 32: return compression == kNoCompression || compression == kBitFields;
        default: return false;
    }
}

/// Masks lie inside headers that are long enough and behind the others, three of them.
void ParseMasks(TZmByteReader& reader, std::uint32_t header_bytes, std::uint32_t compression,
                TZmDibInfo& info) {
    if (compression != kBitFields) {
        info.masks = info.bit_count == 16 ? kMasks555 : kMasks888;
        return;
    }
    const bool has_alpha_mask =
        header_bytes >= kHeaderWithAlphaBytes && header_bytes != kOs2HeaderBytes;
    if (header_bytes == kOs2HeaderBytes) {
        reader.MoveTo(kOs2HeaderBytes);
    }
    for (std::size_t i = 0; i < (has_alpha_mask ? 4u : 3u); ++i) {
        info.masks[i] = reader.U32LE();
    }
    if (reader.Position() > header_bytes) {
        info.pixel_offset = reader.Position();
    }
}

/// The fields behind the header's size; false for those that make no picture.
bool ParseFields(TZmByteReader& reader, std::uint32_t header_bytes, TZmDibInfo& info,
                 std::uint32_t& compression, std::uint32_t& colors_used) {
    if (header_bytes == kCoreHeaderBytes) {
        info.width = reader.U16LE();
        info.height = reader.U16LE();
        reader.Skip(2);
        info.bit_count = reader.U16LE();
    } else {
        info.width = reader.S32LE();
        const std::int32_t height = reader.S32LE();
        if (height == kMinInt32) {
            return false;
        }
        info.is_top_down = height < 0;
        info.height = info.is_top_down ? -height : height;
        reader.Skip(2);
        info.bit_count = reader.U16LE();
        compression = reader.U32LE();
        reader.Skip(12);
        colors_used = reader.U32LE();
        reader.Skip(4);
    }
    return !reader.HasFailed() && info.width > 0 && info.height > 0 &&
           IsDepth(info.bit_count, compression);
}

/// The colour table; deep pictures may carry one too, as a hint, which is skipped.
bool ParsePalette(TZmByteReader& reader, std::uint32_t header_bytes, std::uint32_t colors_used,
                  TZmDibInfo& info) {
    const std::size_t entry_bytes = header_bytes == kCoreHeaderBytes ? 3 : 4;
    const std::uint32_t most = info.bit_count <= 8 ? 1u << info.bit_count : 0;
    const std::uint32_t count = most != 0 && colors_used == 0 ? most : colors_used;
    if (count > reader.Remaining() / entry_bytes || (most != 0 && count > most)) {
        return false;
    }
    info.palette.resize(most);
    for (std::uint32_t i = 0; i < std::min(count, most); ++i) {
        info.palette[i].b = reader.U8();
        info.palette[i].g = reader.U8();
        info.palette[i].r = reader.U8();
        reader.Skip(entry_bytes - 3);
    }
    if (most == 0) {
        reader.Skip(count * entry_bytes);
    }
    return true;
}

/// A channel of a pixel in 8 bits, its largest value 255.
std::uint8_t ChannelOf(std::uint32_t pixel, std::uint32_t mask) {
    if (mask == 0) {
        return 0;
    }
    const int width = std::countr_one(mask >> std::countr_zero(mask));
    const std::uint32_t largest = width >= 32 ? 0xFFFFFFFFu : (1u << width) - 1;
    const std::uint32_t value = pixel >> std::countr_zero(mask) & largest;
    if (largest == 255) {
        return static_cast<std::uint8_t>(value);  // most pictures; a division takes its time
    }
    return static_cast<std::uint8_t>((std::uint64_t{value} * 255 + largest / 2) / largest);
}

std::uint32_t PixelAt(const std::uint8_t* row, std::int32_t x, std::int32_t bit_count) {
    const std::uint8_t* const bytes = row + std::int64_t{x} * (bit_count / 8);
    const std::uint32_t low = bytes[0] | std::uint32_t{bytes[1]} << 8;
    return bit_count == 16 ? low
                           : low | std::uint32_t{bytes[2]} << 16 | std::uint32_t{bytes[3]} << 24;
}

std::size_t IndexAt(const std::uint8_t* row, std::int32_t x, std::int32_t bit_count) {
    switch (bit_count) {
        case 1: return row[x >> 3] >> (7 - (x & 7)) & 1u;
        case 4: return row[x >> 1] >> ((x & 1) == 0 ? 4 : 0) & 15u;
        default: return row[x];
    }
}

/// A row as zm24RGB, its alpha beside it when `alpha` is given.
void DecodeColors(const TZmDibInfo& info, const std::uint8_t* source, std::uint8_t* dest,
                  std::uint8_t* alpha) {
    if (info.bit_count == 24) {
        std::memcpy(dest, source, static_cast<std::size_t>(info.width) * 3);
        return;
    }
    for (std::int32_t x = 0; x < info.width; ++x, dest += 3) {
        if (info.bit_count <= 8) {
            const TRGB color = info.palette[IndexAt(source, x, info.bit_count)];
            std::memcpy(dest, &color, 3);
            continue;
        }
        const std::uint32_t pixel = PixelAt(source, x, info.bit_count);
        dest[0] = ChannelOf(pixel, info.masks[2]);
        dest[1] = ChannelOf(pixel, info.masks[1]);
        dest[2] = ChannelOf(pixel, info.masks[0]);
        if (alpha != nullptr) {
            alpha[x] = ChannelOf(pixel, info.masks[3]);
        }
    }
}

bool IsGrayRamp(const std::vector<TRGB>& palette) {
    for (std::size_t i = 0; i < palette.size(); ++i) {
        const auto value = static_cast<std::uint8_t>(i);
        if (palette[i] != TRGB{value, value, value}) {
            return false;
        }
    }
    return palette.size() == 256;
}

/// Black and white stay bits, a grey ramp stays grey, all else becomes colour.
TZmPixelFormat FormatOf(const TZmDibInfo& info) {
    if (info.bit_count == 1) {
        const bool is_plain = info.palette[0] == kBlack && info.palette[1] == kWhite;
        const bool is_inverse = info.palette[0] == kWhite && info.palette[1] == kBlack;
        return is_plain || is_inverse ? zm1g : zm24RGB;
    }
    return info.bit_count == 8 && IsGrayRamp(info.palette) ? zm8g : zm24RGB;
}

/// Whether all rows lie within the bytes; the last one may lack its padding.
bool HoldsAllRows(const TZmDibInfo& info, std::int64_t pixel_bytes) {
    const std::int64_t used_bytes = (std::int64_t{info.width} * info.bit_count + 7) / 8;
    const auto leading = CheckedMul(info.row_bytes, info.height - 1);
    return leading && *leading <= pixel_bytes - used_bytes;
}

void DecodeRow(const TZmDibInfo& info, const std::uint8_t* source, TZmBitmap& dest,
               std::int32_t y) {
    std::uint8_t* const row = dest.GetScanLine(y);
    if (dest.GetPixelFormat() == zm24RGB) {
        TZmBitmap* const plane = dest.GetAlphaChannelRaw();
        DecodeColors(info, source, row, plane != nullptr ? plane->GetScanLine(y) : nullptr);
        return;
    }
    const auto used_bytes =
        static_cast<std::size_t>((std::int64_t{info.width} * info.bit_count + 7) / 8);
    const std::uint8_t flip = info.bit_count == 1 && info.palette[0] == kWhite ? 255 : 0;
    for (std::size_t i = 0; i < used_bytes; ++i) {
        row[i] = source[i] ^ flip;
    }
}

/// Whether any value of a plane differs from 0: an alpha of nothing but 0 was never filled in.
bool HasAnyAlpha(TZmBitmap& plane) {
    for (std::int32_t y = 0; y < plane.GetHeight(); ++y) {
        const std::uint8_t* const row = plane.GetScanLine(y);
        if (std::any_of(row, row + plane.GetWidth(), [](std::uint8_t a) { return a != 0; })) {
            return true;
        }
    }
    return false;
}

// Writing.

/// The format that a picture's rows are written in.
TZmPixelFormat DibFormatFor(TZmPixelFormat format) {
    switch (format) {
        case zm1g:
        case zm8p:
        case zm8g: return format;
        case zm16g:
        case zm32f: return zm8g;
        default: return zm24RGB;
    }
}

std::vector<TRGB> PaletteFor(TZmBitmap& bitmap, TZmPixelFormat format) {
    if (format == zm1g) {
        return {kBlack, kWhite};
    }
    std::vector<TRGB> palette(format == zm8p || format == zm8g ? 256 : 0);
    for (std::size_t i = 0; i < palette.size(); ++i) {
        const auto value = static_cast<std::uint8_t>(i);
        palette[i] = format == zm8p ? bitmap.GetPalette(static_cast<std::int32_t>(i))
                                    : TRGB{value, value, value};
    }
    return palette;
}

}  // namespace

std::optional<TZmDibInfo> ParseDibInfo(std::span<const std::uint8_t> bytes) {
    TZmByteReader reader(bytes);
    const std::uint32_t header_bytes = reader.U32LE();
    const bool is_known = header_bytes == kCoreHeaderBytes || header_bytes >= kDibHeaderBytes;
    if (!is_known || header_bytes > bytes.size()) {
        return std::nullopt;
    }
    TZmDibInfo info;
    std::uint32_t compression = kNoCompression;
    std::uint32_t colors_used = 0;
    if (!ParseFields(reader, header_bytes, info, compression, colors_used)) {
        return std::nullopt;
    }
    info.pixel_offset = header_bytes;
    ParseMasks(reader, header_bytes, compression, info);
    reader.MoveTo(info.pixel_offset);
    const auto row_bytes = CalcRowLen(info.width, info.bit_count, kAlignmentBits);
    if (!row_bytes || !ParsePalette(reader, header_bytes, colors_used, info) ||
        reader.HasFailed()) {
        return std::nullopt;
    }
    info.row_bytes = *row_bytes;
    info.pixel_offset = reader.Position();
    return info;
}

std::vector<std::uint8_t> MakeDibInfo(std::int32_t width, std::int32_t height,
                                      std::int32_t bit_count, const std::vector<TRGB>& palette,
                                      std::int32_t dpi_x, std::int32_t dpi_y) {
    const auto per_metre = [](std::int32_t dpi) {
        return static_cast<std::uint32_t>(RoundHalfEven(dpi / 2.54 * 100));
    };
    const std::int64_t row_bytes = CalcRowLen(width, bit_count, kAlignmentBits).value_or(0);
    std::vector<std::uint8_t> bytes(kDibHeaderBytes + palette.size() * 4, 0);
    PutU32LE(&bytes[0], kDibHeaderBytes);
    PutU32LE(&bytes[4], static_cast<std::uint32_t>(width));
    PutU32LE(&bytes[8], static_cast<std::uint32_t>(height));
    PutU16LE(&bytes[12], 1);
    PutU16LE(&bytes[14], static_cast<std::uint32_t>(bit_count));
    PutU32LE(&bytes[20], static_cast<std::uint32_t>(row_bytes * height));
    PutU32LE(&bytes[24], per_metre(dpi_x));
    PutU32LE(&bytes[28], per_metre(dpi_y));
    PutU32LE(&bytes[32], static_cast<std::uint32_t>(palette.size()));
    for (std::size_t i = 0; i < palette.size(); ++i) {
        std::memcpy(&bytes[kDibHeaderBytes + i * 4], &palette[i], sizeof(TRGB));
    }
    return bytes;
}

// The bitmap's side.

bool TZmBitmap::CopyFromDIB(const void* dib, std::int64_t dib_bytes) {
    if (dib == nullptr || dib_bytes < 0 || !FitsAddressSpace(dib_bytes)) {
        return false;
    }
    const auto* const bytes = static_cast<const std::uint8_t*>(dib);
    const auto info = ParseDibInfo({bytes, static_cast<std::size_t>(dib_bytes)});
    return info && CopyFromDIB(dib, dib_bytes, bytes + info->pixel_offset,
                               dib_bytes - static_cast<std::int64_t>(info->pixel_offset));
}

bool TZmBitmap::CopyFromDIB(const void* bitmap_info, std::int64_t info_bytes, const void* pixels,
                            std::int64_t pixel_bytes) {
    if (bitmap_info == nullptr || pixels == nullptr || fIsVirtual || info_bytes < 0 ||
        !FitsAddressSpace(info_bytes)) {
        return false;
    }
    const auto info = ParseDibInfo(
        {static_cast<const std::uint8_t*>(bitmap_info), static_cast<std::size_t>(info_bytes)});
    if (!info || !HoldsAllRows(*info, pixel_bytes)) {
        return false;
    }
    TZmBitmap loaded;
    loaded.fMinFileSize = fMinFileSize;
    loaded.fMemoryAllocator = fMemoryAllocator;
    loaded.fOrigin = fOrigin;
    if (!loaded.Allocate(info->width, info->height, FormatOf(*info))) {
        return false;
    }
    if (info->masks[3] != 0 && !fIsAlpha) {
        TZmBitmap* const plane = loaded.GetAlphaChannel();
        if (plane == nullptr || plane->IsEmpty()) {
            return false;
        }
    }
    const auto* row = static_cast<const std::uint8_t*>(pixels);
    for (std::int32_t y = 0; y < info->height; ++y, row += info->row_bytes) {
        DecodeRow(*info, row, loaded, info->is_top_down ? y : info->height - 1 - y);
    }
    if (TZmBitmap* const plane = loaded.GetAlphaChannelRaw()) {
        plane->SyncFull();
        if (plane->fFull || !HasAnyAlpha(*plane)) {
            loaded.RemoveAlphaChannel(/*merge=*/false, 0);
        }
    }
    return TakeCropped(loaded);
}

std::vector<std::uint8_t> TZmBitmap::CreateDIB(std::int32_t dpi_x, std::int32_t dpi_y) {
    return CreateDIB(0, 0, GetWidth() - 1, fHeight - 1, dpi_x, dpi_y);
}

std::vector<std::uint8_t> TZmBitmap::CreateDIB(std::int32_t x1, std::int32_t y1, std::int32_t x2,
                                               std::int32_t y2, std::int32_t dpi_x,
                                               std::int32_t dpi_y) {
    x1 = std::max(x1, 0);
    y1 = std::max(y1, 0);
    x2 = std::min(x2, GetWidth() - 1);
    y2 = std::min(y2, fHeight - 1);
    if (IsEmpty() || x1 > x2 || y1 > y2) {
        return {};
    }
    const std::int32_t width = x2 - x1 + 1;
    const std::int32_t height = y2 - y1 + 1;
    const TZmPixelFormat format = DibFormatFor(fPixelFormat);
    const std::int32_t bit_count = PixelFormatInfo(format).bit_count;
    const auto row_bytes = CalcRowLen(width, bit_count, kAlignmentBits);
    const std::vector<TRGB> palette = PaletteFor(*this, format);
    std::vector<std::uint8_t> dib = MakeDibInfo(width, height, bit_count, palette, dpi_x, dpi_y);
    const std::size_t pixel_offset = dib.size();
    if (!row_bytes || *row_bytes > kMostPixelBytes / height) {
        return {};
    }
    dib.resize(pixel_offset + static_cast<std::size_t>(*row_bytes * height));
    TZmBitmap target;
    target.EncapsulateMemory(dib.data() + pixel_offset, width, height, format,
                             /*do_free_image=*/false, zmboBOTTOMLEFT);
    if (format == zm8p) {
        CopyPaletteTo(&target);
    }
    CopyRectTo(&target, x1, y1, 0, 0, width, height, /*copy_alpha=*/false);
    return dib;
}

}  // namespace zm
