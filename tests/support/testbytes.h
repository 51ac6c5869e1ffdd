#pragma once

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <string>
#include <utility>
#include <vector>

/// Hand-made files.
namespace zm::test {

using TBytes = std::vector<std::uint8_t>;

/// Writes a number in four bytes, the low one first; what would lie behind the end is left out.
inline void PutNumber(TBytes& bytes, std::size_t place, std::uint32_t value) {
    for (std::size_t i = 0; i < 4 && place + i < bytes.size(); ++i) {
        bytes[place + i] = static_cast<std::uint8_t>(value >> 8 * i);
    }
}

/// Zeros, and numbers written over them in their order.
inline TBytes BytesWith(std::size_t size,
                        std::initializer_list<std::pair<std::size_t, std::uint32_t>> numbers) {
    TBytes bytes(size);
    for (const auto& [place, value] : numbers) {
        PutNumber(bytes, place, value);
    }
    return bytes;
}

/// Text, then zeros up to a size.
inline TBytes Padded(const std::string& text, std::size_t size) {
    TBytes bytes(text.begin(), text.end());
    bytes.resize(size);
    return bytes;
}

inline TBytes Joined(TBytes first, const TBytes& second) {
    first.insert(first.end(), second.begin(), second.end());
    return first;
}

}  // namespace zm::test
