// Wireless bitmap, reader and writer (WAP-237, Wireless Application Environment, appendix on
// WBMP): type 0, black and white without compression. The header is a type, a byte of flags, width
// and height as integers of 7 bits a byte, the most significant first, of which all but the last
// have their top bit set. Rows go from the top down in whole bytes, the most significant bit
// leftmost, 1 being white. Extension headers and other types are not supported; none are in use.

#include "engine/codecs/wbmpfilt.h"

#include <array>
#include <cstring>
#include <memory>
#include <optional>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/codecs/accessscope_p.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/io/zmbufferedstreams.h"
#include "engine/io/zmimagelimits.h"
#include "engine/io/zmioparams.h"

namespace zm {

namespace {

constexpr std::int32_t kBufferBytes = 8192;
constexpr std::uint8_t kTypeBlackAndWhite = 0;
constexpr std::uint8_t kNoExtensions = 0;
constexpr std::uint8_t kMoreBytesFollow = 0x80;
constexpr int kValueBitsPerByte = 7;

enum class TWbmpStatus { kOk, kTruncated, kBadData, kTooLarge, kNoMemory, kStopped, kWriteFailed };

struct TWbmpHeader {
    std::int32_t width = 0;
    std::int32_t height = 0;
};

std::int32_t RowBytes(std::int32_t width) {
    return static_cast<std::int32_t>((std::int64_t{width} + 7) / 8);
}

std::optional<std::uint8_t> ReadByte(TStream& stream) {
    std::uint8_t byte = 0;
    return stream.Read(&byte, 1) == 1 ? std::optional(byte) : std::nullopt;
}

/// Nothing at the end of the data and for values beyond 31 bits.
std::optional<std::int32_t> ReadNumber(TStream& stream) {
    std::int64_t value = 0;
    for (;;) {
        const auto byte = ReadByte(stream);
        if (!byte) {
            return std::nullopt;
        }
        value = value << kValueBitsPerByte | (*byte & ~kMoreBytesFollow);
        if (value > kMaxInt32) {
            return std::nullopt;
        }
        if ((*byte & kMoreBytesFollow) == 0) {
            return static_cast<std::int32_t>(value);
        }
    }
}

TWbmpStatus ReadHeader(TStream& stream, TWbmpHeader& header) {
    const auto type = ReadByte(stream);
    const auto flags = ReadByte(stream);
    if (type != kTypeBlackAndWhite || flags != kNoExtensions) {
        return TWbmpStatus::kBadData;
    }
    header.width = ReadNumber(stream).value_or(0);
    header.height = ReadNumber(stream).value_or(0);
    return header.width > 0 && header.height > 0 ? TWbmpStatus::kOk : TWbmpStatus::kBadData;
}

TWbmpStatus CheckSize(const TWbmpHeader& header, std::int64_t file_bytes) {
    const bool is_acceptable =
        ImageSizeIsAcceptable(header.width, header.height, /*bits_per_pixel=*/1, file_bytes);
    return is_acceptable ? TWbmpStatus::kOk : TWbmpStatus::kTooLarge;
}

void FillParams(const TWbmpHeader& header, TIOParams& params) {
    params.fWidth = params.fOriginalWidth = header.width;
    params.fHeight = params.fOriginalHeight = header.height;
    params.fBitsPerSample = 1;
    params.fSamplesPerPixel = 1;
    params.SetImageCount(1);
    params.FreeColorMap();
}

TWbmpStatus ReadRows(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress) {
    const TAccessScope access(bitmap, zmdWrite);
    const std::int32_t row_bytes = RowBytes(bitmap.GetWidth());
    const std::int32_t height = bitmap.GetHeight();
    progress.val = 0;
    progress.per1 = 100.0 / height;
    for (std::int32_t y = 0; y < height; ++y) {
        std::uint8_t* row = bitmap.GetScanLine(y);
        if (row == nullptr) {
            return TWbmpStatus::kNoMemory;
        }
        if (stream.Read(row, row_bytes) < row_bytes) {
            return TWbmpStatus::kTruncated;
        }
        if (!StepProgress(progress, y + 1)) {
            return TWbmpStatus::kStopped;
        }
    }
    return TWbmpStatus::kOk;
}

TWbmpStatus ReadImage(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool params_only,
                      TProgressRec& progress) {
    const std::int64_t file_bytes = stream.GetSize() - stream.GetPosition();
    TZmBufferedReadStream input(&stream, kBufferBytes, /*use_relative_position=*/true);
    TWbmpHeader header;
    TWbmpStatus status = ReadHeader(input, header);
    if (status == TWbmpStatus::kOk) {
        status = CheckSize(header, file_bytes);
    }
    if (status != TWbmpStatus::kOk) {
        return status;
    }
    FillParams(header, params);
    if (params_only) {
        return TWbmpStatus::kOk;
    }
    if (!bitmap.Allocate(header.width, header.height, zm1g)) {
        return TWbmpStatus::kNoMemory;
    }
    return ReadRows(input, bitmap, progress);
}

void WriteNumber(TStream& output, std::int32_t value) {
    constexpr int kMostBytes = 5;
    std::array<std::uint8_t, kMostBytes> bytes{};
    int first = kMostBytes - 1;
    bytes[kMostBytes - 1] = static_cast<std::uint8_t>(value & 0x7F);
    for (value >>= kValueBitsPerByte; value > 0; value >>= kValueBitsPerByte) {
        bytes[static_cast<std::size_t>(--first)] =
            static_cast<std::uint8_t>((value & 0x7F) | kMoreBytesFollow);
    }
    output.Write(bytes.data() + first, kMostBytes - first);
}

TWbmpStatus WriteRows(TZmBufferedWriteStream& output, TZmBitmap& bitmap, TProgressRec& progress) {
    const TAccessScope access(bitmap, zmdRead);
    const std::int32_t width = bitmap.GetWidth();
    const std::int32_t height = bitmap.GetHeight();
    const std::int32_t row_bytes = RowBytes(width);
    const auto last_mask = static_cast<std::uint8_t>(0xFF << (row_bytes * 8 - width));
    progress.val = 0;
    progress.per1 = 100.0 / height;
    for (std::int32_t y = 0; y < height; ++y) {
        const std::uint8_t* row = bitmap.GetScanLine(y);
        if (row == nullptr) {
            return TWbmpStatus::kNoMemory;
        }
        // The bits behind the last pixel are 0 in the file whatever the row holds there.
        const auto last = static_cast<std::uint8_t>(row[row_bytes - 1] & last_mask);
        output.Write(row, row_bytes - 1);
        output.Write(&last, 1);
        if (output.HasFailed()) {
            return TWbmpStatus::kWriteFailed;
        }
        if (!StepProgress(progress, y + 1)) {
            return TWbmpStatus::kStopped;
        }
    }
    return TWbmpStatus::kOk;
}

TWbmpStatus WriteImage(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress) {
    std::unique_ptr<TZmBitmap> converted;
    TZmBitmap* source = &bitmap;
    if (bitmap.GetPixelFormat() != zm1g) {
        converted = std::make_unique<TZmBitmap>();
        converted->AssignImage(&bitmap);
        source = converted.get();
        if (source->IsEmpty() || !source->SetPixelFormat(zm1g)) {
            return TWbmpStatus::kNoMemory;
        }
    }
    TZmBufferedWriteStream output(&stream, kBufferBytes);
    const std::array<std::uint8_t, 2> start{kTypeBlackAndWhite, kNoExtensions};
    output.Write(start.data(), static_cast<std::int32_t>(start.size()));
    WriteNumber(output, source->GetWidth());
    WriteNumber(output, source->GetHeight());
    const TWbmpStatus status = WriteRows(output, *source, progress);
    output.Seek(0, soCurrent);
    return output.HasFailed() ? TWbmpStatus::kWriteFailed : status;
}

}  // namespace

void ReadWBMPStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool params_only,
                    TProgressRec& progress) {
    TWbmpStatus status = TWbmpStatus::kNoMemory;
    try {
        status = ReadImage(stream, bitmap, params, params_only, progress);
    } catch (...) {
        // The memory or the stream gave up; readers report by the flag alone.
        status = TWbmpStatus::kNoMemory;
    }
    if (status != TWbmpStatus::kOk) {
        *progress.Aborting = true;
    }
}

void WriteWBMPStream(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress) {
    TWbmpStatus status = TWbmpStatus::kNoMemory;
    if (!bitmap.IsEmpty()) {
        try {
            status = WriteImage(stream, bitmap, progress);
        } catch (...) {
            status = TWbmpStatus::kNoMemory;
        }
    }
    if (status != TWbmpStatus::kOk) {
        *progress.Aborting = true;
    }
}

}  // namespace zm
