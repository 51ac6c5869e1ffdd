#pragma once

#include <cstdint>
#include <initializer_list>
#include <vector>

#include "engine/foundation/zmbytereader.h"

namespace zm::test {

/// A metafile of 20 by 10 millimetres, recorded for a device of 4 pixels per millimetre: 80 by 40.
class TMetafileRecorder {
public:
    TMetafileRecorder() {
        Add(1, {0, 0, 80,       40, 0, 0, 2000, 1000, 0x464D4520, 0x10000,
                0, 0, kHandles, 0,  0, 0, 1000, 1000, 250,        250});
    }
    void Add(std::uint32_t type, std::initializer_list<std::int64_t> words) {
        Put(type);
        Put(static_cast<std::int64_t>(words.size() + 2) * 4);
        for (const std::int64_t word : words) {
            Put(word);
        }
    }
    /// A solid brush of a colour, and no pen.
    void SelectBrush(std::uint32_t color) {
        Add(39, {1, 0, color, 0});
        Add(37, {1});
        Add(37, {0x80000008});
    }
    std::vector<std::uint8_t> Finish() {
        Add(14, {0, 16, 20});
        PutU32LE(bytes_.data() + 48, static_cast<std::uint32_t>(bytes_.size()));
        return bytes_;
    }

private:
    static constexpr std::int64_t kHandles = 4;
    void Put(std::int64_t word) {
        bytes_.resize(bytes_.size() + 4);
        PutU32LE(bytes_.data() + bytes_.size() - 4, static_cast<std::uint32_t>(word));
    }
    std::vector<std::uint8_t> bytes_;
};

}  // namespace zm::test
