// Mirroring of an image in place, by rows.

#include <algorithm>
#include <array>
#include <cstring>

#include "engine/proc/zmrotate.h"
#include "engine/proc/zmrotate_p.h"

namespace zm {
namespace {

/// Bytes that are exchanged at a time by a vertical flip.
constexpr std::size_t kExchangeBytes = 4096;

template <std::size_t N>
void ReverseSamples(const std::uint8_t* row, std::int32_t width, std::uint8_t* out) {
    const std::uint8_t* from = row + static_cast<std::size_t>(width) * N;
    for (std::int32_t x = 0; x < width; ++x, out += N) {
        from -= N;
        std::memcpy(out, from, N);
    }
}

constexpr std::uint8_t ReverseBits(unsigned byte) {
    byte = (byte & 0xF0u) >> 4 | (byte & 0x0Fu) << 4;
    byte = (byte & 0xCCu) >> 2 | (byte & 0x33u) << 2;
    return static_cast<std::uint8_t>((byte & 0xAAu) >> 1 | (byte & 0x55u) << 1);
}

constexpr std::size_t kByteValues = 256;

constexpr std::array<std::uint8_t, kByteValues> MakeReversedBytes() {
    std::array<std::uint8_t, kByteValues> table{};
    for (std::size_t i = 0; i < kByteValues; ++i) {
        table[i] = ReverseBits(static_cast<unsigned>(i));
    }
    return table;
}

constexpr std::array<std::uint8_t, kByteValues> kReversed = MakeReversedBytes();

/// Bytes and their bits in reverse order, then moved left by the bits that the last byte has
/// beyond the width, so that the image stays at the left.
void ReverseBitRow(const std::uint8_t* row, std::int32_t width, std::uint8_t* out) {
    const std::size_t bytes = (static_cast<std::size_t>(width) + 7) / 8;
    const int shift = (8 - width % 8) % 8;
    unsigned present = kReversed[row[bytes - 1]];
    for (std::size_t i = 0; i < bytes; ++i) {
        const unsigned next = i + 1 < bytes ? kReversed[row[bytes - 2 - i]] : 0u;
        out[i] = static_cast<std::uint8_t>((present << 8 | next) >> (8 - shift));
        present = next;
    }
}

void FlipHorizontally(TZmBitmap& bitmap) {
    const std::size_t bytes = PixelBytes(bitmap);
    std::vector<std::uint8_t> reversed(bytes);
    for (std::int32_t y = 0; y < bitmap.GetHeight(); ++y) {
        std::uint8_t* const row = bitmap.GetScanLine(y);
        ReverseRow(row, bitmap.GetWidth(), bitmap.GetBitCount(), reversed.data());
        std::memcpy(row, reversed.data(), bytes);
    }
}

void ExchangeRows(std::uint8_t* one, std::uint8_t* other, std::size_t bytes) {
    std::array<std::uint8_t, kExchangeBytes> kept;
    for (std::size_t done = 0; done < bytes;) {
        const std::size_t count = std::min(kExchangeBytes, bytes - done);
        std::memcpy(kept.data(), one + done, count);
        std::memcpy(one + done, other + done, count);
        std::memcpy(other + done, kept.data(), count);
        done += count;
    }
}

void FlipVertically(TZmBitmap& bitmap) {
    const std::size_t bytes = PixelBytes(bitmap);
    const std::int32_t height = bitmap.GetHeight();
    for (std::int32_t y = 0; y < height / 2; ++y) {
        const std::int32_t opposite = height - 1 - y;
        std::uint8_t* const upper = bitmap.GetRow(y);
        std::uint8_t* const lower = bitmap.GetRow(opposite);
        ExchangeRows(upper, lower, bytes);
        bitmap.FreeRow(opposite);
        bitmap.FreeRow(y);
    }
}

}  // namespace

void ReverseRowPlain(const std::uint8_t* row, std::int32_t width, std::int32_t bit_count,
                     std::uint8_t* out) {
    if (bit_count == 1) {
        std::memset(out, 0, (static_cast<std::size_t>(width) + 7) / 8);
        for (std::int32_t x = 0; x < width; ++x) {
            const std::int32_t from = width - 1 - x;
            const unsigned bit = row[from >> 3] >> (7 - (from & 7)) & 1u;
            out[x >> 3] = static_cast<std::uint8_t>(out[x >> 3] | bit << (7 - (x & 7)));
        }
        return;
    }
    const std::int32_t bytes = bit_count / 8;
    for (std::int32_t x = 0; x < width; ++x) {
        for (std::int32_t i = 0; i < bytes; ++i) {
            out[std::int64_t{x} * bytes + i] = row[(std::int64_t{width} - 1 - x) * bytes + i];
        }
    }
}

void ReverseRow(const std::uint8_t* row, std::int32_t width, std::int32_t bit_count,
                std::uint8_t* out) {
    switch (bit_count) {
        case 1: ReverseBitRow(row, width, out); break;
        case 8: std::reverse_copy(row, row + width, out); break;
        case 16: ReverseSamples<2>(row, width, out); break;
        case 24: {
            const std::int32_t done = ReverseBlocks24(row, width, out);
            ReverseSamples<3>(row, width - done, out + static_cast<std::size_t>(done) * 3);
            break;
        }
        case 32: ReverseSamples<4>(row, width, out); break;
        default: ReverseSamples<6>(row, width, out); break;
    }
}

void FlipBitmap(TZmBitmap& bitmap, TFlipDir direction) {
    const bool is_flip = direction == fdHorizontal || direction == fdVertical;
    if (!is_flip || bitmap.IsEmpty() || bitmap.GetIsVirtual()) {
        return;
    }
    if (direction == fdHorizontal) {
        FlipHorizontally(bitmap);
    } else {
        FlipVertically(bitmap);
    }
    if (TZmBitmap* const plane = bitmap.GetAlphaChannelRaw()) {
        FlipBitmap(*plane, direction);
    }
}

}  // namespace zm
