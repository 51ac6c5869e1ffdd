// Writer of Windows and OS/2 bitmaps: 1, 4, 8, 24 and 32 bits per pixel, run-length coding at 4
// and 8 bits. The headers are written twice, the second time with the sizes that are known only
// when the rows have gone out.

#include <algorithm>
#include <cstring>
#include <optional>

#include "engine/bitmap/zmquantizer.h"
#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/bmpfilt.h"
#include "engine/codecs/bmpfilt_p.h"
#include "engine/codecs/colorcopy_p.h"
#include "engine/foundation/zmbytereader.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstreams.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmioparams.h"

namespace zm {
namespace {

constexpr std::int32_t kOutputBufferBytes = 65536;
constexpr std::int32_t kMaxCoreSide = 65535;  // the 12-byte header counts in words
constexpr std::int64_t kMaxFileBytes = 0xFFFFFFFF;
// Required: readers of older files know this order of the two bytes, a run of one pixel behind
// the last row.
constexpr std::array<std::uint8_t, 2> kEndMark = {1, 0};

// What is written, settled before the first byte goes out.
struct TBmpPlan {
    std::int32_t width = 0;
    std::int32_t height = 0;
    std::int32_t bit_count = 24;
    std::uint32_t header_bytes = kBmpInfoHeaderBytes;
    std::uint32_t compression = kBmpNone;
    std::int32_t dpi_x = 0;
    std::int32_t dpi_y = 0;
    std::vector<TRGB> palette;  // 1 << bit_count entries below 9 bits

    std::size_t PaletteEntryBytes() const { return header_bytes == kBmpCoreHeaderBytes ? 3 : 4; }
    std::int64_t PixelOffset() const {
        return kBmpFileHeaderBytes + header_bytes +
               static_cast<std::int64_t>(palette.size() * PaletteEntryBytes());
    }
    std::int64_t RowBytes() const { return BmpRowBytes(width, bit_count); }
};

// One row in file form: `row` has RowBytes() bytes, all zero at entry. False when the bitmap's
// row cannot be reached.
using TFillRow = std::function<bool(std::int32_t y, std::uint8_t* row)>;

std::int32_t ChooseBitCount(const TIOParams& params, bool with_alpha) {
    if (params.fBitsPerSample == 1 || params.fBitsPerSample == 4) {
        return params.fBitsPerSample;
    }
    if (params.fSamplesPerPixel == 1) {
        return 8;
    }
    return with_alpha ? 32 : 24;
}

std::uint32_t HeaderBytesOfVersion(TIOBMPVersion version) {
    switch (version) {
        case ioBMP_BMOS2V1: return kBmpCoreHeaderBytes;
        case ioBMP_BMOS2V2: return kBmpOs2HeaderBytes;
        default: return kBmpInfoHeaderBytes;
    }
}

// The 12-byte header has no field that would tell of a compression.
std::uint32_t ChooseCompression(const TIOParams& params, std::int32_t bit_count) {
    if (params.fBMP_Compression != ioBMP_RLE || params.fBMP_Version == ioBMP_BMOS2V1) {
        return kBmpNone;
    }
    return bit_count == 4 ? kBmpRle4 : bit_count == 8 ? kBmpRle8 : kBmpNone;
}

TBmpPlan MakePlan(TZmBitmap& bitmap, const TIOParams& params, bool with_alpha) {
    TBmpPlan plan;
    plan.width = bitmap.GetWidth();
    plan.height = bitmap.GetHeight();
    plan.bit_count = ChooseBitCount(params, with_alpha);
    plan.header_bytes = HeaderBytesOfVersion(params.fBMP_Version);
    plan.compression = ChooseCompression(params, plan.bit_count);
    plan.dpi_x = params.GetDpiX();
    plan.dpi_y = params.GetDpiY();
    if (plan.bit_count < 9) {
        plan.palette.resize(std::size_t{1} << plan.bit_count);
    }
    return plan;
}

// Sizes that the fields of the file cannot hold.
TBmpStatus CheckPlan(const TBmpPlan& plan) {
    if (plan.width < 1 || plan.height < 1) {
        return TBmpStatus::kUnsupported;
    }
    if (plan.header_bytes == kBmpCoreHeaderBytes &&
        (plan.width > kMaxCoreSide || plan.height > kMaxCoreSide)) {
        return TBmpStatus::kTooLarge;
    }
    const std::int64_t file_bytes = plan.PixelOffset() + plan.RowBytes() * plan.height;
    if (!FitsAddressSpace(plan.RowBytes()) ||
        (plan.compression == kBmpNone && file_bytes > kMaxFileBytes)) {
        return TBmpStatus::kTooLarge;
    }
    return TBmpStatus::kOk;
}

std::uint32_t PixelsPerMetre(std::int32_t dpi) {
    return static_cast<std::uint32_t>(RoundHalfEven(dpi / 2.54 * 100));
}

void PutCoreHeader(const TBmpPlan& plan, std::uint8_t* target) {
    PutU32LE(target, plan.header_bytes);
    PutU16LE(target + 4, static_cast<std::uint32_t>(plan.width));
    PutU16LE(target + 6, static_cast<std::uint32_t>(plan.height));
    PutU16LE(target + 8, 1);
    PutU16LE(target + 10, static_cast<std::uint32_t>(plan.bit_count));
}

void PutInfoHeader(const TBmpPlan& plan, std::int64_t data_bytes, std::uint8_t* target) {
    const bool has_palette = plan.bit_count < 9;
    PutU32LE(target, plan.header_bytes);
    PutU32LE(target + 4, static_cast<std::uint32_t>(plan.width));
    PutU32LE(target + 8, static_cast<std::uint32_t>(plan.height));
    PutU16LE(target + 12, 1);
    PutU16LE(target + 14, static_cast<std::uint32_t>(plan.bit_count));
    PutU32LE(target + 16, plan.compression);
    // Only the 40-byte form tells the size of the data.
    const bool tells_size = plan.header_bytes == kBmpInfoHeaderBytes;
    PutU32LE(target + 20, tells_size ? static_cast<std::uint32_t>(data_bytes) : 0);
    PutU32LE(target + 24, PixelsPerMetre(plan.dpi_x));
    PutU32LE(target + 28, PixelsPerMetre(plan.dpi_y));
    PutU32LE(target + 32, has_palette ? 1u << plan.bit_count : 0);
    // Required: colours important follow the depth even without a palette; 2 to the 32nd leaves
    // 0 in the field.
    PutU32LE(target + 36, plan.bit_count < 32 ? 1u << plan.bit_count : 0);
}

// Both headers. A data size of nothing makes the placeholder that stands until the rows are out.
std::vector<std::uint8_t> MakeHeaders(const TBmpPlan& plan,
                                      std::optional<std::int64_t> data_bytes) {
    std::vector<std::uint8_t> bytes(kBmpFileHeaderBytes + plan.header_bytes, 0);
    PutU16LE(bytes.data(), kBmpType);
    if (data_bytes) {
        PutU32LE(bytes.data() + 2, static_cast<std::uint32_t>(plan.PixelOffset() + *data_bytes));
        PutU32LE(bytes.data() + 10, static_cast<std::uint32_t>(plan.PixelOffset()));
    }
    if (plan.header_bytes == kBmpCoreHeaderBytes) {
        PutCoreHeader(plan, bytes.data() + kBmpFileHeaderBytes);
    } else {
        PutInfoHeader(plan, data_bytes.value_or(0), bytes.data() + kBmpFileHeaderBytes);
    }
    return bytes;
}

TBmpStatus WriteBytes(TStream& output, const std::vector<std::uint8_t>& bytes) {
    if (bytes.size() > static_cast<std::size_t>(kMaxInt32)) {
        return TBmpStatus::kTooLarge;
    }
    const auto count = static_cast<std::int32_t>(bytes.size());
    return output.Write(bytes.data(), count) == count ? TBmpStatus::kOk : TBmpStatus::kWriteFailed;
}

TBmpStatus WritePalette(TStream& output, const TBmpPlan& plan) {
    const std::size_t entry_bytes = plan.PaletteEntryBytes();
    std::vector<std::uint8_t> bytes(plan.palette.size() * entry_bytes, 0);
    for (std::size_t i = 0; i < plan.palette.size(); ++i) {
        bytes[i * entry_bytes] = plan.palette[i].b;
        bytes[i * entry_bytes + 1] = plan.palette[i].g;
        bytes[i * entry_bytes + 2] = plan.palette[i].r;
    }
    return WriteBytes(output, bytes);
}

// ---- 1 bit ----

// Black and white by threshold, for images of more than two colours. The conversion may change
// the format of its source, so it gets a copy.
bool ConvertToBlackWhite(TZmBitmap& source, TZmBitmap& bits) {
    TZmBitmap colors;
    if (!CopyColors(source, colors) ||
        !bits.Allocate(source.GetWidth(), source.GetHeight(), zm1g)) {
        return false;
    }
    bits.CopyAndConvertFormat(&colors);
    return true;
}

// The two colours go to the palette; the result is the bitmap that has the bits, or nil.
TZmBitmap* PrepareBits(TZmBitmap& source, TZmBitmap& scratch, TBmpPlan& plan) {
    plan.palette = {TRGB{0, 0, 0}, TRGB{255, 255, 255}};
    if (source.GetPixelFormat() == zm1g) {
        return &source;
    }
    TRGB dark;
    TRGB light;
    if (ReduceToTwoColors(source, scratch, dark, light)) {
        plan.palette = {dark, light};
        return &scratch;
    }
    return ConvertToBlackWhite(source, scratch) ? &scratch : nullptr;
}

bool FillRow1(TZmBitmap& bits, std::int32_t y, std::uint8_t* row) {
    const std::uint8_t* source = bits.GetScanLine(y);
    if (source == nullptr) {
        return false;
    }
    const std::int32_t width = bits.GetWidth();
    const std::size_t count = (static_cast<std::size_t>(width) + 7) / 8;
    std::memcpy(row, source, count);
    const std::int32_t unused_bits = static_cast<std::int32_t>(count * 8) - width;
    row[count - 1] = static_cast<std::uint8_t>(row[count - 1] & (0xFF << unused_bits));
    return true;
}

// ---- 4 and 8 bits ----

bool HasIndicesBelow16(TZmBitmap& source) {
    for (std::int32_t y = 0; y < source.GetHeight(); ++y) {
        const std::uint8_t* row = source.GetScanLine(y);
        if (row == nullptr ||
            std::any_of(row, row + source.GetWidth(), [](std::uint8_t i) { return i > 15; })) {
            return false;
        }
    }
    return true;
}

// Rows of palette indices, one byte each.
class TIndexRows {
public:
    // Also fills the plan's palette. Call IsReady before the first row.
    TIndexRows(TZmBitmap& source, TBmpPlan& plan) : source_(&source) {
        const TZmPixelFormat format = source.GetPixelFormat();
        takes_values_ = format == zm8p || (format == zm8g && plan.bit_count == 8);
        if (format == zm8p && plan.bit_count == 4 && !HasIndicesBelow16(source)) {
            // More entries than the file can have: the colours are counted anew.
            takes_values_ = false;
            is_ready_ = CopyColors(source, colors_);
            source_ = &colors_;
        }
        if (is_ready_) {
            const auto colors = static_cast<std::int32_t>(plan.palette.size());
            quantizer_.emplace(*source_, plan.palette, colors);
            plan.palette.resize(static_cast<std::size_t>(colors));
            rows_.emplace(*source_);
            last_index_ = colors - 1;
        }
    }

    bool IsReady() const { return is_ready_; }

    bool GetIndices(std::int32_t y, std::vector<std::uint8_t>& indices) {
        if (takes_values_) {
            const std::uint8_t* row = source_->GetScanLine(y);
            if (row != nullptr) {
                std::memcpy(indices.data(), row, indices.size());
            }
            return row != nullptr;
        }
        const TRGB* row = rows_->GetRow(y);
        if (row == nullptr) {
            return false;
        }
        std::transform(row, row + indices.size(), indices.begin(), [this](TRGB color) {
            const std::int32_t index = quantizer_->GetRGBIndex(color);
            return static_cast<std::uint8_t>(std::clamp(index, 0, last_index_));
        });
        return true;
    }

private:
    TZmBitmap* source_;
    TZmBitmap colors_;
    std::optional<TZmQuantizer> quantizer_;
    std::optional<TZmRgbRows> rows_;
    std::int32_t last_index_ = 0;
    bool takes_values_ = false;  // the bitmap's bytes are the indices
    bool is_ready_ = true;
};

void PackRow4(const std::vector<std::uint8_t>& indices, std::uint8_t* row) {
    for (std::size_t x = 0; x < indices.size(); ++x) {
        row[x / 2] = static_cast<std::uint8_t>(row[x / 2] |
                                               (x % 2 == 0 ? indices[x] << 4 : indices[x] & 15));
    }
}

// ---- 24 and 32 bits ----

bool FillRow24(TZmRgbRows& colors, std::int32_t width, std::int32_t y, std::uint8_t* row) {
    const TRGB* source = colors.GetRow(y);
    if (source != nullptr) {
        std::memcpy(row, source, static_cast<std::size_t>(width) * sizeof(TRGB));
    }
    return source != nullptr;
}

// Pixels that the plane does not reach are opaque.
bool FillRow32(TZmRgbRows& colors, TZmBitmap& plane, std::int32_t width, std::int32_t y,
               std::uint8_t* row) {
    const TRGB* source = colors.GetRow(y);
    if (source == nullptr) {
        return false;
    }
    const std::uint8_t* alpha = y < plane.GetHeight() ? plane.GetScanLine(y) : nullptr;
    const std::int32_t alpha_width = alpha == nullptr ? 0 : plane.GetWidth();
    for (std::int32_t x = 0; x < width; ++x) {
        std::uint8_t* pixel = row + std::ptrdiff_t{x} * 4;
        pixel[0] = source[x].b;
        pixel[1] = source[x].g;
        pixel[2] = source[x].r;
        pixel[3] = x < alpha_width ? alpha[x] : std::uint8_t{255};
    }
    return true;
}

// ---- rows and file ----

TBmpStatus WriteRows(TStream& output, const TBmpPlan& plan, const TFillRow& fill,
                     TProgressRec& progress) {
    std::vector<std::uint8_t> row(static_cast<std::size_t>(plan.RowBytes()), 0);
    for (std::int32_t done = 0; done < plan.height; ++done) {
        if (!StepProgress(progress, done)) {
            return TBmpStatus::kStopped;
        }
        std::fill(row.begin(), row.end(), std::uint8_t{0});
        if (!fill(plan.height - 1 - done, row.data())) {
            return TBmpStatus::kNoMemory;
        }
        const TBmpStatus status = WriteBytes(output, row);
        if (status != TBmpStatus::kOk) {
            return status;
        }
    }
    return TBmpStatus::kOk;
}

TBmpStatus WriteRleRows(TStream& output, const TBmpPlan& plan, TIndexRows& rows,
                        TProgressRec& progress) {
    std::vector<std::uint8_t> indices(static_cast<std::size_t>(plan.width));
    std::vector<std::uint8_t> encoded;
    for (std::int32_t done = 0; done < plan.height; ++done) {
        if (!StepProgress(progress, done)) {
            return TBmpStatus::kStopped;
        }
        if (!rows.GetIndices(plan.height - 1 - done, indices)) {
            return TBmpStatus::kNoMemory;
        }
        encoded.clear();
        if (plan.compression == kBmpRle8) {
            EncodeBmpRle8Row(indices, encoded);
        } else {
            EncodeBmpRle4Row(indices, encoded);
        }
        const TBmpStatus status = WriteBytes(output, encoded);
        if (status != TBmpStatus::kOk) {
            return status;
        }
    }
    return WriteBytes(output, {kEndMark.begin(), kEndMark.end()});
}

// One call of the writer.
struct TBmpWrite {
    TStream& output;
    TZmBitmap& bitmap;
    TIOParams& params;
    TProgressRec& progress;
    TBmpPlan plan;
};

// Headers with their sizes still open, then the palette.
TBmpStatus WriteStart(TBmpWrite& write) {
    const TBmpStatus status = WriteBytes(write.output, MakeHeaders(write.plan, std::nullopt));
    return status == TBmpStatus::kOk ? WritePalette(write.output, write.plan) : status;
}

TBmpStatus WriteBits(TBmpWrite& write) {
    TZmBitmap scratch;
    TZmBitmap* bits = PrepareBits(write.bitmap, scratch, write.plan);
    if (bits == nullptr) {
        return TBmpStatus::kNoMemory;
    }
    const TBmpStatus status = WriteStart(write);
    if (status != TBmpStatus::kOk) {
        return status;
    }
    const auto fill = [bits](std::int32_t y, std::uint8_t* row) { return FillRow1(*bits, y, row); };
    return WriteRows(write.output, write.plan, fill, write.progress);
}

TBmpStatus WriteIndices(TBmpWrite& write) {
    TIndexRows rows(write.bitmap, write.plan);
    if (!rows.IsReady()) {
        return TBmpStatus::kNoMemory;
    }
    write.params.fColorMap = write.plan.palette;
    write.params.fColorMapCount = static_cast<std::int32_t>(write.plan.palette.size());
    const TBmpStatus status = WriteStart(write);
    if (status != TBmpStatus::kOk) {
        return status;
    }
    if (write.plan.compression != kBmpNone) {
        return WriteRleRows(write.output, write.plan, rows, write.progress);
    }
    std::vector<std::uint8_t> indices(static_cast<std::size_t>(write.plan.width));
    const bool is_4_bits = write.plan.bit_count == 4;
    const auto fill = [&](std::int32_t y, std::uint8_t* row) {
        if (!rows.GetIndices(y, indices)) {
            return false;
        }
        if (is_4_bits) {
            PackRow4(indices, row);
        } else {
            std::memcpy(row, indices.data(), indices.size());
        }
        return true;
    };
    return WriteRows(write.output, write.plan, fill, write.progress);
}

TBmpStatus WriteColors(TBmpWrite& write) {
    const TBmpStatus status = WriteStart(write);
    if (status != TBmpStatus::kOk) {
        return status;
    }
    TZmRgbRows colors(write.bitmap);
    const std::int32_t width = write.plan.width;
    TZmBitmap* plane = write.plan.bit_count == 32 ? write.bitmap.GetAlphaChannelRaw() : nullptr;
    const auto fill = [&](std::int32_t y, std::uint8_t* row) {
        return plane != nullptr ? FillRow32(colors, *plane, width, y, row)
                                : FillRow24(colors, width, y, row);
    };
    return WriteRows(write.output, write.plan, fill, write.progress);
}

TBmpStatus WriteContents(TBmpWrite& write) {
    switch (write.plan.bit_count) {
        case 1: return WriteBits(write);
        case 4:
        case 8: return WriteIndices(write);
        default: return WriteColors(write);
    }
}

TBmpStatus WriteImage(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool with_alpha,
                      TProgressRec& progress) {
    TBmpPlan plan = MakePlan(bitmap, params, with_alpha);
    TBmpStatus status = CheckPlan(plan);
    if (status != TBmpStatus::kOk) {
        return status;
    }
    progress.val = 0;
    progress.per1 = 100.0 / plan.height;
    const std::int64_t start = stream.GetPosition();
    TZmBufferedWriteStream output(&stream, kOutputBufferBytes);
    TBmpWrite write{output, bitmap, params, progress, std::move(plan)};
    status = WriteContents(write);
    if (status != TBmpStatus::kOk) {
        return status;
    }
    const std::int64_t end = output.Seek(0, soCurrent);
    if (end - start > kMaxFileBytes) {
        return TBmpStatus::kTooLarge;
    }
    output.Seek(start, soBeginning);
    status = WriteBytes(output, MakeHeaders(write.plan, end - start - write.plan.PixelOffset()));
    output.Seek(end, soBeginning);
    return output.HasFailed() ? TBmpStatus::kWriteFailed : status;
}

}  // namespace

// Alpha that does not go to the file is not looked at; the bitmap keeps its plane.
void WriteBMPStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool handle_transparency,
                    TProgressRec& progress) {
    const bool with_alpha = handle_transparency && bitmap.HasAlphaChannel();
    TBmpStatus status = TBmpStatus::kNoMemory;
    try {
        status = WriteImage(stream, bitmap, params, with_alpha, progress);
    } catch (...) {
        // The memory or the stream gave up: told by the flag, like any failed write.
        status = TBmpStatus::kNoMemory;
    }
    if (status != TBmpStatus::kOk) {
        *progress.Aborting = true;
    }
}

}  // namespace zm
