// Nearest copy: samples are copied without any conversion, in every pixel format.
//
// The source column of x is Trunc(x * (sw/dw)) and the source row of y Trunc(y * (sh/dh)), both
// limited to the image.

#include <algorithm>
#include <cstring>
#include <vector>

#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

/// Columns that are built at a time, so that the tables of the widest 1-bit rows stay small. A
/// multiple of 8: a chunk of a 1-bit row begins with a byte.
constexpr std::int32_t kChunkColumns = 1 << 20;

struct TChunk {
    std::int32_t first = 0;
    std::vector<std::int32_t> source_columns;
    std::vector<std::uint8_t> samples;
};

template <std::size_t kBytes>
void CopySamples(const std::uint8_t* row, TChunk& chunk) {
    std::uint8_t* out = chunk.samples.data();
    for (const std::int32_t column : chunk.source_columns) {
        std::memcpy(out, row + static_cast<std::size_t>(column) * kBytes, kBytes);
        out += kBytes;
    }
}

void CopyBits(const std::uint8_t* row, TChunk& chunk) {
    std::fill(chunk.samples.begin(), chunk.samples.end(), std::uint8_t{0});
    std::size_t x = 0;
    for (const std::int32_t column : chunk.source_columns) {
        const unsigned bit = row[column >> 3] >> (7 - (column & 7)) & 1u;
        chunk.samples[x >> 3] =
            static_cast<std::uint8_t>(chunk.samples[x >> 3] | bit << (7 - (x & 7)));
        ++x;
    }
}

using TCopyFunction = void (*)(const std::uint8_t* row, TChunk& chunk);

TCopyFunction CopyFunctionFor(std::int32_t bit_count) {
    switch (bit_count) {
        case 1: return CopyBits;
        case 8: return CopySamples<1>;
        case 16: return CopySamples<2>;
        case 24: return CopySamples<3>;
        case 32: return CopySamples<4>;
        case 48: return CopySamples<6>;
        default: return nullptr;
    }
}

TChunk MakeChunk(std::int32_t first, std::int32_t count, double ratio, std::int32_t source_width,
                 std::int32_t bit_count) {
    TChunk chunk;
    chunk.first = first;
    chunk.source_columns.resize(static_cast<std::size_t>(count));
    for (std::int32_t i = 0; i < count; ++i) {
        const std::int32_t column = TruncToInt((first + i) * ratio);
        chunk.source_columns[static_cast<std::size_t>(i)] = std::min(source_width - 1, column);
    }
    chunk.samples.resize((static_cast<std::size_t>(count) * static_cast<unsigned>(bit_count) + 7) /
                         8);
    return chunk;
}

void CopyRows(TZmBitmap& source, TZmBitmap& target, TChunk& chunk, TCopyFunction copy) {
    const std::int32_t source_height = source.GetHeight();
    const std::int32_t target_height = target.GetHeight();
    const double ratio = static_cast<double>(source_height) / target_height;
    const std::int64_t offset = static_cast<std::int64_t>(chunk.first) * target.GetBitCount() / 8;
    std::int32_t built_row = -1;
    for (std::int32_t y = 0; y < target_height; ++y) {
        const std::int32_t source_row = std::min(source_height - 1, TruncToInt(y * ratio));
        if (source_row != built_row) {
            const std::uint8_t* row = source.GetScanLine(source_row);
            if (row != nullptr) {
                copy(row, chunk);
            }
            built_row = source_row;
        }
        std::uint8_t* out = target.GetScanLine(y);
        if (out != nullptr) {
            std::memcpy(out + offset, chunk.samples.data(), chunk.samples.size());
        }
    }
}

}  // namespace

bool ResampleNearest(TZmBitmap& source, TZmBitmap& target) {
    if (source.IsEmpty() || target.IsEmpty()) {
        return false;
    }
    const TCopyFunction copy = CopyFunctionFor(source.GetBitCount());
    if (copy == nullptr || !FitTargetFormat(target, source.GetPixelFormat())) {
        return false;
    }
    if (source.GetPixelFormat() == zm8p) {
        source.CopyPaletteTo(&target);
        target.SetPaletteUsed(source.GetPaletteUsed());
    }
    const TAccessGuard reading(source, zmdRead);
    const TAccessGuard writing(target, zmdWrite);
    const std::int32_t width = target.GetWidth();
    const double ratio = static_cast<double>(source.GetWidth()) / width;
    for (std::int32_t first = 0; first < width;) {
        const std::int32_t count = std::min(kChunkColumns, width - first);
        TChunk chunk = MakeChunk(first, count, ratio, source.GetWidth(), source.GetBitCount());
        CopyRows(source, target, chunk, copy);
        first += count;
    }
    return true;
}

}  // namespace zm
