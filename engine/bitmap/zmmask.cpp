#include "engine/bitmap/zmmask.h"

#include <algorithm>
#include <cstring>

#include "engine/bitmap/zmbitmapmemory_p.h"
#include "engine/bitmap/zmpixelformats.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

std::uint8_t BitOf(std::int32_t x) {
    return static_cast<std::uint8_t>(0x80 >> (x & 7));
}

/// First and last non-zero pixel of a row.
struct TSpan {
    std::int32_t first;
    std::int32_t last;
};

bool IsSet(const std::uint8_t* row, std::int32_t x, std::int32_t bits_per_pixel) {
    return bits_per_pixel == 8 ? row[x] != 0 : (row[x >> 3] & BitOf(x)) != 0;
}

TSpan FindSpan(const std::uint8_t* row, std::int32_t width, std::int32_t bits_per_pixel) {
    std::int32_t first = 0;
    while (first < width && !IsSet(row, first, bits_per_pixel)) {
        ++first;
    }
    std::int32_t last = width - 1;
    while (last > first && !IsSet(row, last, bits_per_pixel)) {
        --last;
    }
    return {first, last};
}

bool IsRowFull(const std::uint8_t* row, std::int32_t width, std::int32_t bits_per_pixel) {
    const std::int32_t whole_bytes = bits_per_pixel == 8 ? width : width / 8;
    if (!std::all_of(row, row + whole_bytes, [](std::uint8_t byte) { return byte == 255; })) {
        return false;
    }
    for (std::int32_t x = whole_bytes * 8; bits_per_pixel == 1 && x < width; ++x) {
        if (!IsSet(row, x, 1)) {
            return false;
        }
    }
    return true;
}

}  // namespace

void TZmMaskBitsDeleter::operator()(std::uint8_t* bits) const {
    FreeBitmapBlock(bits, zmmaAuto, size_bytes);
}

void TZmMask::ResetRect() {
    fX1 = kMaxInt32;
    fY1 = kMaxInt32;
    fX2 = 0;
    fY2 = 0;
}

bool TZmMask::AllocateBits(std::int32_t width, std::int32_t height, std::int32_t bits_per_pixel) {
    FreeBits();
    if (width < 1 || height < 1 || (bits_per_pixel != 1 && bits_per_pixel != 8)) {
        return false;
    }
    const auto row_len = CalcRowLen(width, bits_per_pixel, 32);
    if (!row_len || !FitsAddressSpace(*row_len * height)) {
        return false;
    }
    fWidth = width;
    fHeight = height;
    fBitsperpixel = bits_per_pixel;
    fRowlen = *row_len;
    return true;
}

void TZmMask::FreeBits() {
    fBits.reset();
    fWidth = 0;
    fHeight = 0;
    fBitsperpixel = 0;
    fRowlen = 0;
    fFull = false;
    ResetRect();
}

std::uint8_t* TZmMask::GetScanLine(std::int32_t row) {
    if (row < 0 || row >= fHeight) {
        return nullptr;
    }
    if (fBits == nullptr) {
        const std::int64_t size_bytes = fRowlen * fHeight;
        void* const block = AllocateBitmapBlock(zmmaAuto, size_bytes);
        if (block == nullptr) {
            return nullptr;
        }
        std::memset(block, 0, BitsSize());
        fBits = {static_cast<std::uint8_t*>(block), TZmMaskBitsDeleter{size_bytes}};
    }
    return fBits.get() + (fHeight - row - 1) * fRowlen;
}

void TZmMask::SetPixel(std::int32_t x, std::int32_t y, std::int32_t alpha) {
    if (x < 0 || x >= fWidth || y < 0 || y >= fHeight) {
        return;
    }
    std::uint8_t* const row = GetScanLine(y);
    if (row == nullptr) {
        return;
    }
    if (alpha != 0) {
        fX1 = std::min(fX1, x);
        fY1 = std::min(fY1, y);
        fX2 = std::max(fX2, x);
        fY2 = std::max(fY2, y);
    }
    // Required: a mask of one bit keeps its flag whatever is written; callers that clear bits
    // run SyncFull.
    fFull = fFull && (fBitsperpixel != 8 || alpha == 255);
    if (fBitsperpixel == 8) {
        row[x] = static_cast<std::uint8_t>(alpha);
    } else if (alpha != 0) {
        row[x >> 3] = static_cast<std::uint8_t>(row[x >> 3] | BitOf(x));
    } else {
        row[x >> 3] = static_cast<std::uint8_t>(row[x >> 3] & ~BitOf(x));
    }
}

std::int32_t TZmMask::GetPixel(std::int32_t x, std::int32_t y) {
    if (x < 0 || x >= fWidth) {
        return 0;
    }
    const std::uint8_t* const row = GetScanLine(y);
    if (row == nullptr) {
        return 0;
    }
    return fBitsperpixel == 8 ? row[x] : IsSet(row, x, 1) ? 1 : 0;
}

void TZmMask::Fill(std::int32_t alpha) {
    if (GetScanLine(0) == nullptr) {
        return;
    }
    const std::int32_t byte = fBitsperpixel == 8 ? alpha & 255 : alpha != 0 ? 255 : 0;
    std::memset(fBits.get(), byte, BitsSize());
    ResetRect();
    fFull = byte == 255;
    if (byte != 0) {
        fX1 = 0;
        fY1 = 0;
        fX2 = fWidth - 1;
        fY2 = fHeight - 1;
    }
}

void TZmMask::Empty() {
    if (fBits != nullptr) {
        std::memset(fBits.get(), 0, BitsSize());
    }
    fFull = false;
    ResetRect();
}

void TZmMask::Assign(TZmMask& source) {
    if (&source == this) {
        return;
    }
    FreeBits();
    fWidth = source.fWidth;
    fHeight = source.fHeight;
    fBitsperpixel = source.fBitsperpixel;
    fRowlen = source.fRowlen;
    if (source.fBits != nullptr) {
        if (GetScanLine(0) == nullptr) {
            FreeBits();
            return;
        }
        std::memcpy(fBits.get(), source.fBits.get(), BitsSize());
    }
    fX1 = source.fX1;
    fY1 = source.fY1;
    fX2 = source.fX2;
    fY2 = source.fY2;
    fFull = source.fFull;
}

void TZmMask::SyncFull() {
    fFull = fHeight > 0;
    for (std::int32_t y = 0; fFull && y < fHeight; ++y) {
        const std::uint8_t* const row = GetScanLine(y);
        fFull = row != nullptr && IsRowFull(row, fWidth, fBitsperpixel);
    }
}

void TZmMask::SyncRect() {
    ResetRect();
    for (std::int32_t y = 0; y < fHeight; ++y) {
        const std::uint8_t* const row = GetScanLine(y);
        if (row == nullptr) {
            return;
        }
        const TSpan span = FindSpan(row, fWidth, fBitsperpixel);
        if (span.first < fWidth) {
            fX1 = std::min(fX1, span.first);
            fX2 = std::max(fX2, span.last);
            fY1 = std::min(fY1, y);
            fY2 = y;
        }
    }
}

}  // namespace zm
