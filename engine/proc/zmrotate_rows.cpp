// Rows of a source that is read out of order.

#include <algorithm>
#include <cstring>

#include "engine/proc/zmrotate_p.h"

namespace zm {
namespace {

/// Copies of rows of an image in a file, all together.
constexpr std::int64_t kCopyBytes = std::int64_t{64} << 20;
/// Enough for the taps of a single column of any engine.
constexpr std::int32_t kMinCopies = 16;

}  // namespace

std::size_t PixelBytes(TZmBitmap& bitmap) {
    const std::int64_t bits = std::int64_t{bitmap.GetWidth()} * bitmap.GetBitCount();
    return static_cast<std::size_t>((bits + 7) / 8);
}

TSourceRows::TSourceRows(TZmBitmap& source) : source_(source), row_bytes_(PixelBytes(source)) {
    const std::int32_t height = source.GetHeight();
    rows_.resize(static_cast<std::size_t>(height));
    if (source.GetLocation() != zmFile) {
        capacity_ = height;
        for (std::int32_t y = 0; y < height; ++y) {
            rows_[static_cast<std::size_t>(y)] = source.GetScanLine(y);
        }
        return;
    }
    const std::int64_t fitting = kCopyBytes / static_cast<std::int64_t>(row_bytes_);
    capacity_ = static_cast<std::int32_t>(
        std::clamp<std::int64_t>(fitting, std::min(kMinCopies, height), height));
    copies_ = MakeWorkBuffer<std::uint8_t>(static_cast<std::int64_t>(row_bytes_) * capacity_);
    held_.assign(static_cast<std::size_t>(capacity_), -1);
}

void TSourceRows::Require(std::int32_t first, std::int32_t last) {
    if (IsDirect()) {
        return;
    }
    for (std::int32_t row = first; row <= last; ++row) {
        if (rows_[static_cast<std::size_t>(row)] == nullptr) {
            Load(row);
        }
    }
}

/// Each row has one place, so that neighbouring rows never push each other out.
void TSourceRows::Load(std::int32_t row) {
    const auto place = static_cast<std::size_t>(row % capacity_);
    std::uint8_t* const copy = copies_.data() + place * row_bytes_;
    if (held_[place] >= 0) {
        rows_[static_cast<std::size_t>(held_[place])] = nullptr;
    }
    std::memcpy(copy, source_.GetScanLine(row), row_bytes_);
    held_[place] = row;
    rows_[static_cast<std::size_t>(row)] = copy;
}

}  // namespace zm
