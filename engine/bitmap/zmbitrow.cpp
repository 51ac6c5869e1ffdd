#include "engine/bitmap/zmbitrow_p.h"

#include <cstring>

namespace zm {
namespace {

/// Bits `first` to `first + count - 1` of a byte, counted from the most significant.
std::uint8_t BitMask(std::int64_t first, std::int64_t count) {
    return static_cast<std::uint8_t>((0xFF00 >> count & 0xFF) >> first);
}

void StoreMasked(std::uint8_t* dest, std::uint8_t value, std::uint8_t mask) {
    *dest = static_cast<std::uint8_t>((*dest & ~mask) | (value & mask));
}

/// `count` (1 to 8) bits from a bit position, left-aligned in the result; the bits behind them
/// are undefined. The next byte is read only when the run reaches into it.
std::uint8_t FetchBits(const std::uint8_t* source, std::int64_t bit, std::int64_t count) {
    const std::uint8_t* const first = source + (bit >> 3);
    const int shift = static_cast<int>(bit & 7);
    const unsigned next = shift + count > 8 ? first[1] : 0u;
    return static_cast<std::uint8_t>((*first << shift) | (next >> (8 - shift)));
}

/// Whole bytes of a byte-aligned destination.
void CopyAlignedBytes(const std::uint8_t* source, int shift, std::uint8_t* dest,
                      std::int64_t byte_count) {
    if (shift == 0) {
        std::memcpy(dest, source, static_cast<std::size_t>(byte_count));
        return;
    }
    for (std::int64_t i = 0; i < byte_count; ++i) {
        dest[i] = static_cast<std::uint8_t>((source[i] << shift) | (source[i + 1] >> (8 - shift)));
    }
}

}  // namespace

void CopyBits(const std::uint8_t* source, std::int64_t source_bit, std::uint8_t* dest,
              std::int64_t dest_bit, std::int64_t count) {
    const std::int64_t lead = dest_bit & 7;
    if (count > 0 && lead != 0) {
        const std::int64_t head = count < 8 - lead ? count : 8 - lead;
        const std::uint8_t bits = FetchBits(source, source_bit, head);
        StoreMasked(dest + (dest_bit >> 3), static_cast<std::uint8_t>(bits >> lead),
                    BitMask(lead, head));
        source_bit += head;
        dest_bit += head;
        count -= head;
    }
    if (count <= 0) {
        return;
    }
    const std::int64_t byte_count = count >> 3;
    CopyAlignedBytes(source + (source_bit >> 3), static_cast<int>(source_bit & 7),
                     dest + (dest_bit >> 3), byte_count);
    const std::int64_t tail = count & 7;
    if (tail != 0) {
        const std::uint8_t bits = FetchBits(source, source_bit + byte_count * 8, tail);
        StoreMasked(dest + (dest_bit >> 3) + byte_count, bits, BitMask(0, tail));
    }
}

void FillBits(std::uint8_t* dest, std::int64_t dest_bit, std::int64_t count, bool value) {
    const std::uint8_t byte = value ? 255 : 0;
    const std::int64_t lead = dest_bit & 7;
    if (count > 0 && lead != 0) {
        const std::int64_t head = count < 8 - lead ? count : 8 - lead;
        StoreMasked(dest + (dest_bit >> 3), byte, BitMask(lead, head));
        dest_bit += head;
        count -= head;
    }
    if (count <= 0) {
        return;
    }
    std::uint8_t* const first = dest + (dest_bit >> 3);
    const std::int64_t byte_count = count >> 3;
    std::memset(first, byte, static_cast<std::size_t>(byte_count));
    if ((count & 7) != 0) {
        StoreMasked(first + byte_count, byte, BitMask(0, count & 7));
    }
}

}  // namespace zm
