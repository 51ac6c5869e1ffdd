// Reader of Windows and OS/2 bitmaps (BMP, DIB, RLE): a file header of 14 bytes, an info header
// told by its size, a palette or channel masks, and rows of whole 32-bit words, bottom row first
// unless the height is negative. Little-endian throughout. 1, 2, 4, 8, 16, 24 and 32 bits per
// pixel, RLE4, RLE8 and bit fields; embedded JPEG and PNG, Huffman and 24-bit run-length data are
// not read.

#include "engine/codecs/bmpfilt.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <optional>

#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmpixelformats.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/bmpfilt_p.h"
#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"

namespace zm {
namespace {

constexpr std::size_t kMaxPaletteEntries = 256;
constexpr std::size_t kMasksOffset = 40;  // of the masks inside longer headers
// Rows below this size are gathered by a buffer; larger ones are read from the stream at once.
constexpr std::int64_t kDirectRowBytes = 4096;
constexpr std::int32_t kRowBufferBytes = 65536;

// Channel order of masks and shifts.
enum TChannel : std::uint8_t { kRed, kGreen, kBlue, kAlpha };
using TMasks = std::array<std::uint32_t, 4>;

constexpr TMasks kMasks555 = {0x7C00, 0x03E0, 0x001F, 0};
constexpr TMasks kMasks8888 = {0xFF0000, 0xFF00, 0xFF, 0xFF000000};

struct TBmpHeader {
    std::uint32_t file_bytes = 0;    // as the file header tells; 0 unknown
    std::uint32_t pixel_offset = 0;  // from the start of the file header; 0: behind the palette
    std::uint32_t header_bytes = 0;
    std::int32_t width = 0;
    std::int32_t height = 0;  // without its sign
    bool top_down = false;
    std::int32_t bit_count = 0;
    std::uint32_t compression = kBmpNone;
    std::int32_t pixels_per_metre_x = 0;
    std::int32_t pixels_per_metre_y = 0;
    std::uint32_t colors_used = 0;
    TMasks masks{};
};

// One call of the reader.
struct TBmpRead {
    TBmpRead(TStream& stream_, TZmBitmap& bitmap_, TZmMask& alpha_, TProgressRec& progress_,
             TIOParams& params_)
        : stream(stream_),
          bitmap(bitmap_),
          alpha(alpha_),
          progress(progress_),
          params(params_),
          start(stream_.GetPosition()),
          stream_bytes(stream_.GetSize()) {}

    TStream& stream;
    TZmBitmap& bitmap;
    TZmMask& alpha;
    TProgressRec& progress;
    TIOParams& params;
    std::int64_t start;
    std::int64_t stream_bytes;
    std::int64_t byte_limit = 0;  // 0 for none
    bool ignore_alpha = false;
    bool has_rows = false;  // the bitmap has been allocated for this image
    TBmpHeader header;
    std::array<TRGB, kMaxPaletteEntries> palette{};  // entries that the file lacks are black
    std::int32_t palette_count = 0;
};

// Converts a row of the file to the bitmap's row `dest`, which is row `y` of the image.
using TDecodeRow = void (*)(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest,
                            std::int32_t y);

// Streams may give less than was asked for before their end is reached.
std::size_t ReadFully(TStream& stream, void* target, std::size_t count) {
    auto* bytes = static_cast<std::uint8_t*>(target);
    std::size_t done = 0;
    while (done < count) {
        const std::size_t wanted = std::min<std::size_t>(count - done, std::size_t{1} << 30);
        const std::int32_t got = stream.Read(bytes + done, static_cast<std::int32_t>(wanted));
        if (got <= 0) {
            break;
        }
        done += static_cast<std::size_t>(got);
    }
    return done;
}

std::uint16_t WordAt(const std::uint8_t* bytes, std::int32_t index) {
    const std::uint8_t* at = bytes + std::ptrdiff_t{index} * 2;
    return static_cast<std::uint16_t>(at[0] | at[1] << 8);
}

std::uint32_t DwordAt(const std::uint8_t* bytes, std::int32_t index) {
    const std::uint8_t* at = bytes + std::ptrdiff_t{index} * 4;
    return static_cast<std::uint32_t>(at[0] | at[1] << 8 | at[2] << 16) |
           static_cast<std::uint32_t>(at[3]) << 24;
}

// Positive shifts go right, negative ones left; the low byte is kept.
std::uint8_t ShiftToByte(std::uint32_t value, std::int32_t shift) {
    if (shift <= -32 || shift >= 32) {
        return 0;
    }
    return static_cast<std::uint8_t>(shift >= 0 ? value >> shift : value << -shift);
}

// Length of the lowest run of set bits.
std::int32_t MaskWidth(std::uint32_t mask) {
    return mask == 0 ? 0 : std::countr_one(mask >> std::countr_zero(mask));
}

bool IsOtherHeader(std::uint32_t header_bytes) {
    return header_bytes != kBmpCoreHeaderBytes && header_bytes != kBmpInfoHeaderBytes &&
           header_bytes != kBmpOs2HeaderBytes && header_bytes != kBmpV4HeaderBytes &&
           header_bytes != kBmpV5HeaderBytes;
}

TIOBMPVersion VersionOfHeader(std::uint32_t header_bytes) {
    switch (header_bytes) {
        case kBmpCoreHeaderBytes: return ioBMP_BMOS2V1;
        case kBmpInfoHeaderBytes: return ioBMP_BM3;
        case kBmpOs2HeaderBytes: return ioBMP_BMOS2V2;
        case kBmpV4HeaderBytes: return ioBMP_V4;
        case kBmpV5HeaderBytes: return ioBMP_V5;
        default: return ioBMP_BM;
    }
}

bool HasBitFields(std::uint32_t compression) {
    return compression == kBmpBitFields || compression == kBmpAlphaBitFields;
}

// Which compression goes with which depth; depths outside the table are not read at all. At 24
// bits masks can only name the bytes in their usual order, so they are passed over.
bool IsDepthSupported(std::int32_t bit_count, std::uint32_t compression) {
    switch (bit_count) {
        case 1:
        case 2: return compression == kBmpNone;
        case 4: return compression == kBmpNone || compression == kBmpRle4;
        case 8: return compression == kBmpNone || compression == kBmpRle8;
        case 16:
        case 32: return compression == kBmpNone || HasBitFields(compression);
        case 24: return compression == kBmpNone || compression == kBmpBitFields;
        default: return false;
    }
}

TBmpStatus ReadFileHeader(TBmpRead& read) {
    std::array<std::uint8_t, kBmpFileHeaderBytes> bytes{};
    if (ReadFully(read.stream, bytes.data(), bytes.size()) != bytes.size()) {
        return TBmpStatus::kTruncated;
    }
    TZmByteReader reader(bytes);
    if (reader.U16LE() != kBmpType) {
        return TBmpStatus::kBadData;
    }
    read.header.file_bytes = reader.U32LE();
    reader.Skip(4);
    read.header.pixel_offset = reader.U32LE();
    // A size that ends before the pixels begin is nothing to go by.
    if (read.byte_limit == 0 && read.header.file_bytes > read.header.pixel_offset) {
        read.byte_limit = read.header.file_bytes;
    }
    return TBmpStatus::kOk;
}

void ParseCoreHeader(TZmByteReader& reader, TBmpHeader& header) {
    header.width = reader.U16LE();
    header.height = reader.U16LE();
    reader.Skip(2);
    header.bit_count = reader.U16LE();
}

// False for a height that has no absolute value.
bool ParseInfoHeader(TZmByteReader& reader, TBmpHeader& header) {
    header.width = reader.S32LE();
    header.height = reader.S32LE();
    reader.Skip(2);
    header.bit_count = reader.U16LE();
    header.compression = reader.U32LE();
    reader.Skip(4);
    header.pixels_per_metre_x = reader.S32LE();
    header.pixels_per_metre_y = reader.S32LE();
    header.colors_used = reader.U32LE();
    reader.Skip(4);
    if (header.height == kMinInt32) {
        return false;
    }
    header.top_down = header.height < 0;
    header.height = header.top_down ? -header.height : header.height;
    for (std::uint32_t& mask : header.masks) {
        mask = reader.Remaining() >= 4 ? reader.U32LE() : 0;
    }
    return true;
}

TBmpStatus ReadInfoHeader(TBmpRead& read) {
    TBmpHeader& header = read.header;
    std::array<std::uint8_t, kBmpV5HeaderBytes> block{};
    const std::int64_t header_start = read.stream.GetPosition();
    if (ReadFully(read.stream, block.data(), 4) != 4) {
        return TBmpStatus::kTruncated;
    }
    header.header_bytes = DwordAt(block.data(), 0);
    if (header.header_bytes > read.stream_bytes) {
        return TBmpStatus::kBadData;
    }
    // Unknown headers count as a block of 64 bytes, zero where theirs is shorter.
    const std::uint32_t known_bytes = IsOtherHeader(header.header_bytes)
                                          ? std::min(header.header_bytes, kBmpOs2HeaderBytes)
                                          : header.header_bytes;
    const std::size_t rest = known_bytes > 4 ? known_bytes - 4 : 0;
    if (ReadFully(read.stream, block.data() + 4, rest) != rest) {
        return TBmpStatus::kTruncated;
    }
    read.stream.SetPosition(header_start + header.header_bytes);
    TZmByteReader reader(block);
    reader.Skip(4);
    if (header.header_bytes == kBmpCoreHeaderBytes) {
        ParseCoreHeader(reader, header);
    } else if (!ParseInfoHeader(reader, header)) {
        return TBmpStatus::kBadData;
    }
    return TBmpStatus::kOk;
}

// Before anything is allocated or any data behind the header are believed.
TBmpStatus CheckHeader(const TBmpHeader& header) {
    if (header.width < 0) {
        return TBmpStatus::kBadData;
    }
    return IsDepthSupported(header.bit_count, header.compression) ? TBmpStatus::kOk
                                                                  : TBmpStatus::kUnsupported;
}

std::int32_t DpiFromPixelsPerMetre(std::int32_t pixels_per_metre, std::int32_t default_dpi) {
    const std::int32_t dpi = RoundHalfEven(pixels_per_metre / 100.0 * 2.54);
    return dpi == 0 ? default_dpi : dpi;
}

void StoreHeader(TBmpRead& read) {
    const TBmpHeader& header = read.header;
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    TIOParams& params = read.params;
    params.fBMP_Version = VersionOfHeader(header.header_bytes);
    params.fBMP_Compression = header.compression == kBmpRle8 || header.compression == kBmpRle4
                                  ? ioBMP_RLE
                                  : ioBMP_UNCOMPRESSED;
    params.fWidth = params.fOriginalWidth = header.width;
    params.fHeight = params.fOriginalHeight = header.height;
    params.SetDpiX(DpiFromPixelsPerMetre(header.pixels_per_metre_x, settings.fDefaultDPIX));
    params.SetDpiY(DpiFromPixelsPerMetre(header.pixels_per_metre_y, settings.fDefaultDPIY));
    params.SetImageCount(1);
    const std::int32_t channel_bits = header.bit_count == 16 ? 5 : header.bit_count;
    params.fBitsPerSample = std::min(channel_bits, 8);
    params.fSamplesPerPixel = header.bit_count < 9 ? 1 : header.bit_count == 32 ? 4 : 3;
}

// A palette that the end of the file cuts short is filled up with black; the pixels, which lie
// behind it or are gone too, decide about the file.
void ReadPalette(TBmpRead& read) {
    const TBmpHeader& header = read.header;
    if (header.bit_count > 8) {
        return;
    }
    const bool is_core = header.header_bytes == kBmpCoreHeaderBytes;
    const std::size_t entry_bytes = is_core ? 3 : 4;
    const bool count_given =
        !is_core && header.colors_used > 0 && header.colors_used <= kMaxPaletteEntries;
    const std::uint32_t count = count_given ? header.colors_used : 1u << header.bit_count;
    std::array<std::uint8_t, kMaxPaletteEntries * 4> bytes{};
    ReadFully(read.stream, bytes.data(), count * entry_bytes);
    for (std::size_t i = 0; i < count; ++i) {
        const std::uint8_t* entry = bytes.data() + i * entry_bytes;
        read.palette[i] = TRGB{entry[0], entry[1], entry[2]};
    }
    read.palette_count = static_cast<std::int32_t>(count);
    read.params.fColorMap.assign(read.palette.begin(), read.palette.begin() + count);
    read.params.fColorMapCount = read.palette_count;
}

// Headers that are too short to hold masks have them behind: three at 16 bits, four at 32 and
// where the compression says that alpha has one.
TBmpStatus ReadMasks(TBmpRead& read) {
    TBmpHeader& header = read.header;
    if (header.bit_count != 16 && header.bit_count != 32) {
        return TBmpStatus::kOk;
    }
    if (!HasBitFields(header.compression)) {
        header.masks = header.bit_count == 16 ? kMasks555 : kMasks8888;
        return TBmpStatus::kOk;
    }
    const bool in_header =
        header.header_bytes >= kMasksOffset + 12 && header.header_bytes != kBmpOs2HeaderBytes;
    if (in_header) {
        return TBmpStatus::kOk;
    }
    const bool has_three = header.bit_count == 16 && header.compression == kBmpBitFields;
    std::size_t mask_bytes = has_three ? 12 : 16;
    // Many files with a 40-byte header keep no room for an alpha mask: where the pixels begin
    // behind the third mask, a fourth one would be the first pixel.
    const std::int64_t position = read.stream.GetPosition();
    if (header.pixel_offset != 0 && read.start + header.pixel_offset == position + 12) {
        mask_bytes = 12;
    }
    std::array<std::uint8_t, 16> bytes{};
    if (ReadFully(read.stream, bytes.data(), mask_bytes) != mask_bytes) {
        return TBmpStatus::kTruncated;
    }
    TZmByteReader reader(bytes);
    for (std::uint32_t& mask : header.masks) {
        mask = reader.U32LE();
    }
    return TBmpStatus::kOk;
}

TBmpStatus SeekToPixels(TBmpRead& read) {
    const std::int64_t target = read.start + read.header.pixel_offset;
    if (read.header.pixel_offset == 0 || target == read.stream.GetPosition()) {
        return TBmpStatus::kOk;
    }
    if (target > read.stream_bytes) {
        return TBmpStatus::kTruncated;
    }
    read.stream.SetPosition(target);
    return TBmpStatus::kOk;
}

TBmpStatus ReadHeaders(TBmpRead& read, bool no_file_header) {
    TBmpStatus status = TBmpStatus::kOk;
    if (no_file_header || read.params.fIsResource) {
        read.header.file_bytes = static_cast<std::uint32_t>(read.stream_bytes);
    } else {
        status = ReadFileHeader(read);
    }
    if (status != TBmpStatus::kOk) {
        return status;
    }
    read.params.FreeColorMap();
    status = ReadInfoHeader(read);
    if (status == TBmpStatus::kOk) {
        status = CheckHeader(read.header);
    }
    if (status == TBmpStatus::kOk) {
        StoreHeader(read);
        ReadPalette(read);
        status = ReadMasks(read);
    }
    return status;
}

TZmPixelFormat TargetFormat(const TBmpRead& read) {
    const bool native = read.params.fNativePixelFormat;
    switch (read.header.bit_count) {
        case 1: return zm1g;
        case 4:
        case 8: return native ? zm8p : zm24RGB;
        case 16: return native ? zm16g : zm24RGB;
        default: return zm24RGB;
    }
}

void CopyPaletteToBitmap(TBmpRead& read) {
    for (std::int32_t i = 0; i < static_cast<std::int32_t>(kMaxPaletteEntries); ++i) {
        read.bitmap.SetPalette(i, read.palette[static_cast<std::size_t>(i)]);
    }
    read.bitmap.SetPaletteUsed(read.palette_count);
}

TBmpStatus AllocateImage(TBmpRead& read) {
    const TBmpHeader& header = read.header;
    const TZmPixelFormat format = TargetFormat(read);
    // The alpha mask counts too: 32 bits stand for three bytes of colour and one of alpha.
    const std::int32_t bits = std::max(header.bit_count, PixelFormatInfo(format).bit_count);
    if (!ImageSizeIsAcceptable(header.width, header.height, bits, read.stream_bytes - read.start) ||
        !FitsAddressSpace(BmpRowBytes(header.width, bits))) {
        return TBmpStatus::kTooLarge;
    }
    if (!read.bitmap.Allocate(header.width, header.height, format)) {
        return TBmpStatus::kNoMemory;
    }
    read.has_rows = true;
    if (format == zm8p) {
        CopyPaletteToBitmap(read);
    }
    return TBmpStatus::kOk;
}

std::int32_t ImageRow(const TBmpHeader& header, std::int32_t file_row) {
    return header.top_down ? file_row : header.height - 1 - file_row;
}

// Rows that the file did not deliver are cleared: allocation leaves what was in memory.
void ClearRows(TBmpRead& read, std::int32_t first_file_row) {
    const auto row_bytes = static_cast<std::size_t>(read.bitmap.GetRowLen());
    for (std::int32_t row = first_file_row; row < read.header.height; ++row) {
        std::uint8_t* dest = read.bitmap.GetScanLine(ImageRow(read.header, row));
        if (dest != nullptr) {
            std::memset(dest, 0, row_bytes);
        }
    }
}

void CopyRow1(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    const std::size_t count = (static_cast<std::size_t>(read.header.width) + 7) / 8;
    std::memmove(dest, source, count);
}

// For a palette of white, black: a clear bit is black in the bitmap.
void InvertRow1(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    const std::size_t count = (static_cast<std::size_t>(read.header.width) + 7) / 8;
    std::transform(source, source + count, dest,
                   [](std::uint8_t bits) { return static_cast<std::uint8_t>(~bits); });
}

void ColorRow2(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    auto* pixels = reinterpret_cast<TRGB*>(dest);
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        pixels[x] = read.palette[source[x / 4] >> (6 - x % 4 * 2) & 3];
    }
}

void UnpackRow4(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        const std::uint8_t pair = source[x / 2];
        dest[x] = static_cast<std::uint8_t>(x % 2 == 0 ? pair >> 4 : pair & 15);
    }
}

void ColorRow4(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    auto* pixels = reinterpret_cast<TRGB*>(dest);
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        const std::uint8_t pair = source[x / 2];
        pixels[x] = read.palette[x % 2 == 0 ? pair >> 4 : pair & 15];
    }
}

void CopyRow8(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    std::memmove(dest, source, static_cast<std::size_t>(read.header.width));
}

void ColorRow8(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    auto* pixels = reinterpret_cast<TRGB*>(dest);
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        pixels[x] = read.palette[source[x]];
    }
}

void WordRow16(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        const std::uint16_t word = WordAt(source, x);
        std::memcpy(dest + std::ptrdiff_t{x} * 2, &word, 2);
    }
}

// A mask of all ones marks grey words; the high byte is what 8 bits keep of them.
void GrayRow16(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    auto* pixels = reinterpret_cast<TRGB*>(dest);
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        const auto gray = static_cast<std::uint8_t>(WordAt(source, x) >> 8);
        pixels[x] = TRGB{gray, gray, gray};
    }
}

// Required: channels are taken to lie in the order red, green, blue from the top, their place
// found from the widths alone, and the low bits stay 0; existing jobs compare such pixels.
void ColorRow16(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    const TMasks& masks = read.header.masks;
    const std::int32_t red_width = MaskWidth(masks[kRed]);
    const std::int32_t green_width = MaskWidth(masks[kGreen]);
    const std::int32_t blue_width = MaskWidth(masks[kBlue]);
    const std::int32_t red_shift = green_width + blue_width - (8 - red_width);
    const std::int32_t green_shift = blue_width - (8 - green_width);
    const std::int32_t blue_shift = blue_width - 8;
    auto* pixels = reinterpret_cast<TRGB*>(dest);
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        const std::uint32_t word = WordAt(source, x);
        pixels[x] = TRGB{ShiftToByte(word & masks[kBlue], blue_shift),
                         ShiftToByte(word & masks[kGreen], green_shift),
                         ShiftToByte(word & masks[kRed], red_shift)};
    }
}

void CopyRow24(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    std::memmove(dest, source, static_cast<std::size_t>(read.header.width) * 3);
}

std::uint8_t MaskedByte(std::uint32_t pixel, std::uint32_t mask) {
    return mask == 0 ? std::uint8_t{0}
                     : static_cast<std::uint8_t>((pixel & mask) >> std::countr_zero(mask));
}

void ColorRow32(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest, std::int32_t) {
    const TMasks& masks = read.header.masks;
    auto* pixels = reinterpret_cast<TRGB*>(dest);
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        const std::uint32_t pixel = DwordAt(source, x);
        pixels[x] = TRGB{MaskedByte(pixel, masks[kBlue]), MaskedByte(pixel, masks[kGreen]),
                         MaskedByte(pixel, masks[kRed])};
    }
}

void ColorAlphaRow32(TBmpRead& read, const std::uint8_t* source, std::uint8_t* dest,
                     std::int32_t y) {
    ColorRow32(read, source, dest, y);
    std::uint8_t* alpha = read.alpha.GetScanLine(y);
    if (alpha == nullptr) {
        return;
    }
    const std::uint32_t mask = read.header.masks[kAlpha];
    for (std::int32_t x = 0; x < read.header.width; ++x) {
        alpha[x] = MaskedByte(DwordAt(source, x), mask);
    }
}

bool IsWhiteBlackPalette(const TBmpRead& read) {
    return read.palette_count == 2 && read.palette[0] == TRGB{255, 255, 255} &&
           read.palette[1] == TRGB{};
}

bool HasGrayMask(const TMasks& masks) {
    return std::any_of(masks.begin(), masks.begin() + 3,
                       [](std::uint32_t mask) { return MaskWidth(mask) >= 16; });
}

TDecodeRow ChooseRowDecoder(const TBmpRead& read, bool with_alpha) {
    const bool native = read.params.fNativePixelFormat;
    switch (read.header.bit_count) {
        case 1: return IsWhiteBlackPalette(read) ? InvertRow1 : CopyRow1;
        case 2: return ColorRow2;
        case 4: return native ? UnpackRow4 : ColorRow4;
        case 8: return native ? CopyRow8 : ColorRow8;
        case 16:
            return native ? WordRow16 : HasGrayMask(read.header.masks) ? GrayRow16 : ColorRow16;
        case 24: return CopyRow24;
        default: return with_alpha ? ColorAlphaRow32 : ColorRow32;
    }
}

// Decoders that may work in place, on file bytes read straight into the bitmap's row.
bool WorksInPlace(const TBmpRead& read, std::int64_t row_bytes) {
    return (read.header.bit_count == 1 || read.header.bit_count == 24) &&
           read.bitmap.GetRowLen() >= row_bytes;
}

// What stays the same for all rows of an uncompressed image.
struct TRowPlan {
    TStream& source;
    TDecodeRow decode;
    std::size_t row_bytes;
    std::size_t pixel_bytes;  // of row_bytes, without the padding
    bool in_place;
    std::vector<std::uint8_t> buffer;  // empty with in_place
};

TBmpStatus DecodePlainRow(TBmpRead& read, TRowPlan& plan, std::int32_t file_row) {
    if (!StepProgress(read.progress, file_row)) {
        return TBmpStatus::kStopped;
    }
    const std::int32_t y = ImageRow(read.header, file_row);
    std::uint8_t* dest = read.bitmap.GetScanLine(y);
    if (dest == nullptr) {
        return TBmpStatus::kNoMemory;
    }
    std::uint8_t* target = plan.in_place ? dest : plan.buffer.data();
    // Some writers leave out what pads the last row.
    const bool is_last = file_row == read.header.height - 1;
    if (ReadFully(plan.source, target, plan.row_bytes) <
        (is_last ? plan.pixel_bytes : plan.row_bytes)) {
        return TBmpStatus::kTruncated;
    }
    plan.decode(read, target, dest, y);
    return TBmpStatus::kOk;
}

TBmpStatus DecodePlainRows(TBmpRead& read, TDecodeRow decode) {
    const std::int64_t row_bytes = BmpRowBytes(read.header.width, read.header.bit_count);
    const bool in_place = WorksInPlace(read, row_bytes);
    std::optional<TZmBufferedReadStream> buffered;
    if (row_bytes < kDirectRowBytes) {
        buffered.emplace(&read.stream, kRowBufferBytes, /*use_relative_position=*/false);
    }
    const std::int64_t pixel_bits = std::int64_t{read.header.width} * read.header.bit_count;
    TRowPlan plan{buffered ? *buffered : read.stream,
                  decode,
                  static_cast<std::size_t>(row_bytes),
                  static_cast<std::size_t>((pixel_bits + 7) / 8),
                  in_place,
                  {}};
    plan.buffer.resize(in_place ? 0 : plan.row_bytes);
    for (std::int32_t row = 0; row < read.header.height; ++row) {
        const TBmpStatus status = DecodePlainRow(read, plan, row);
        if (status != TBmpStatus::kOk) {
            ClearRows(read, row);
            return status;
        }
    }
    return TBmpStatus::kOk;
}

TBmpStatus ReadCompressedBytes(TBmpRead& read, std::vector<std::uint8_t>& data) {
    const std::int64_t position = read.stream.GetPosition();
    std::int64_t count = read.stream_bytes - position;
    if (read.byte_limit > 0) {
        count = std::min(count, read.byte_limit - (position - read.start));
    }
    if (count <= 0) {
        return TBmpStatus::kTruncated;
    }
    if (!FitsAddressSpace(count)) {
        return TBmpStatus::kTooLarge;
    }
    data.resize(static_cast<std::size_t>(count));
    data.resize(ReadFully(read.stream, data.data(), data.size()));
    return TBmpStatus::kOk;
}

TBmpStatus DecodeCompressedRows(TBmpRead& read) {
    std::vector<std::uint8_t> data;
    const TBmpStatus status = ReadCompressedBytes(read, data);
    if (status != TBmpStatus::kOk) {
        ClearRows(read, 0);
        return status;
    }
    const TDecodeRow decode = read.params.fNativePixelFormat ? CopyRow8 : ColorRow8;
    bool has_rows = true;
    const auto sink = [&](std::int32_t file_row, const std::uint8_t* indices) {
        const std::int32_t y = ImageRow(read.header, file_row);
        std::uint8_t* dest = read.bitmap.GetScanLine(y);
        if (dest == nullptr) {
            has_rows = false;
            return;
        }
        decode(read, indices, dest, y);
    };
    const auto step = [&](std::int32_t rows_done) {
        return StepProgress(read.progress, rows_done);
    };
    const TBmpRleImage image{data, read.header.width, read.header.height, read.header.compression};
    const TBmpStatus decoded = DecodeBmpRle(image, sink, step);
    return has_rows ? decoded : TBmpStatus::kNoMemory;
}

bool IsAllZero(TZmMask& mask) {
    for (std::int32_t y = 0; y < mask.GetHeight(); ++y) {
        const std::uint8_t* row = mask.GetScanLine(y);
        if (row != nullptr &&
            std::any_of(row, row + mask.GetWidth(), [](std::uint8_t a) { return a != 0; })) {
            return false;
        }
    }
    return true;
}

// All-zero alpha means that the writer of the file knew none; all-opaque alpha says nothing.
void FinishAlpha(TZmMask& alpha, TBmpStatus status) {
    if (alpha.GetWidth() == 0) {
        return;
    }
    alpha.SyncFull();
    if (status != TBmpStatus::kOk || alpha.GetFull() || IsAllZero(alpha)) {
        alpha.FreeBits();
        return;
    }
    alpha.SyncRect();
}

TBmpStatus DecodePixels(TBmpRead& read) {
    const TBmpHeader& header = read.header;
    read.progress.val = 0;
    read.progress.per1 = 100.0 / header.height;
    if (header.compression == kBmpRle8 || header.compression == kBmpRle4) {
        return DecodeCompressedRows(read);
    }
    const bool with_alpha =
        header.bit_count == 32 && !read.ignore_alpha && header.masks[kAlpha] != 0;
    if (with_alpha && (!read.alpha.AllocateBits(header.width, header.height, 8) ||
                       read.alpha.GetScanLine(0) == nullptr)) {
        ClearRows(read, 0);
        return TBmpStatus::kNoMemory;
    }
    const TBmpStatus status = DecodePlainRows(read, ChooseRowDecoder(read, with_alpha));
    FinishAlpha(read.alpha, status);
    return status;
}

TBmpStatus ReadImage(TBmpRead& read, bool no_file_header, bool params_only) {
    TBmpStatus status = ReadHeaders(read, no_file_header);
    const bool has_pixels = read.header.width > 0 && read.header.height > 0;
    if (status != TBmpStatus::kOk || params_only || !has_pixels) {
        return status;
    }
    status = SeekToPixels(read);
    if (status == TBmpStatus::kOk) {
        status = AllocateImage(read);
    }
    return status == TBmpStatus::kOk ? DecodePixels(read) : status;
}

}  // namespace

void ReadBMPStream(TStream& stream, TZmBitmap& bitmap, std::int64_t byte_limit, bool ignore_alpha,
                   TZmMask& alpha, bool no_file_header, bool params_only, TProgressRec& progress,
                   TIOParams& params) {
    TBmpRead read(stream, bitmap, alpha, progress, params);
    read.byte_limit = byte_limit;
    read.ignore_alpha = ignore_alpha;
    alpha.FreeBits();
    TBmpStatus status = TBmpStatus::kNoMemory;
    try {
        status = ReadImage(read, no_file_header, params_only);
    } catch (...) {
        // The memory or the stream gave up; readers report by the flag alone.
        status = TBmpStatus::kNoMemory;
        ClearRows(read, read.has_rows ? 0 : read.header.height);
    }
    if (status != TBmpStatus::kOk) {
        *progress.Aborting = true;
    }
}

}  // namespace zm
