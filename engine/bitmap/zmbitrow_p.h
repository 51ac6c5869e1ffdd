#pragma once

#include <cstdint>

/// Runs of bits in rows of one bit a pixel, most significant bit leftmost. No bit outside the
/// run changes and no byte outside the two runs' bytes is touched.
namespace zm {

/// Copies `count` bits between rows that do not overlap.
void CopyBits(const std::uint8_t* source, std::int64_t source_bit, std::uint8_t* dest,
              std::int64_t dest_bit, std::int64_t count);

/// Sets `count` bits to a value.
void FillBits(std::uint8_t* dest, std::int64_t dest_bit, std::int64_t count, bool value);

}  // namespace zm
