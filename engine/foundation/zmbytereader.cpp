#include "engine/foundation/zmbytereader.h"

namespace zm {

bool TZmByteReader::Take(std::size_t count) {
    if (count > Remaining()) {
        failed_ = true;
        position_ = bytes_.size();
        return false;
    }
    position_ += count;
    return true;
}

std::uint8_t TZmByteReader::U8() {
    return Take(1) ? bytes_[position_ - 1] : std::uint8_t{0};
}

std::uint16_t TZmByteReader::U16LE() {
    if (!Take(2)) {
        return 0;
    }
    return static_cast<std::uint16_t>(bytes_[position_ - 2] | bytes_[position_ - 1] << 8);
}

std::uint16_t TZmByteReader::U16BE() {
    if (!Take(2)) {
        return 0;
    }
    return static_cast<std::uint16_t>(bytes_[position_ - 2] << 8 | bytes_[position_ - 1]);
}

std::uint32_t TZmByteReader::U32LE() {
    if (!Take(4)) {
        return 0;
    }
    std::uint32_t value = 0;
    for (std::size_t i = 1; i <= 4; ++i) {
        value = value << 8 | bytes_[position_ - i];
    }
    return value;
}

std::uint32_t TZmByteReader::U32BE() {
    if (!Take(4)) {
        return 0;
    }
    std::uint32_t value = 0;
    for (std::size_t i = 4; i >= 1; --i) {
        value = value << 8 | bytes_[position_ - i];
    }
    return value;
}

void TZmByteReader::Skip(std::size_t count) {
    Take(count);
}

void TZmByteReader::MoveTo(std::size_t position) {
    if (position > bytes_.size()) {
        failed_ = true;
        position_ = bytes_.size();
        return;
    }
    position_ = position;
}

void PutU16LE(std::uint8_t* target, std::uint32_t value) {
    target[0] = static_cast<std::uint8_t>(value);
    target[1] = static_cast<std::uint8_t>(value >> 8);
}

void PutU32LE(std::uint8_t* target, std::uint32_t value) {
    PutU16LE(target, value);
    PutU16LE(target + 2, value >> 16);
}

}  // namespace zm
