#include "engine/bitmap/zmrgbrows.h"

#include <cstddef>

namespace zm {

static const TRGB* PaletteOf(TZmBitmap& source) {
    return source.GetPixelFormat() == zm8p ? source.GetPaletteArray().data() : nullptr;
}

TZmRgbRows::TZmRgbRows(TZmBitmap& source)
    : source_(source),
      format_(source.GetPixelFormat()),
      width_(source.GetWidth()),
      context_(MakeRowContext(PaletteOf(source))),
      convert_(FindRowFunction(format_, zm24RGB)) {
    if (format_ != zm24RGB && width_ > 0) {
        converted_.resize(static_cast<std::size_t>(width_));
    }
}

const TRGB* TZmRgbRows::GetRow(std::int32_t y) {
    raw_y_ = -1;
    const std::uint8_t* row = source_.GetScanLine(y);
    if (row == nullptr || format_ == zm24RGB) {
        return reinterpret_cast<const TRGB*>(row);
    }
    if (convert_ != nullptr) {
        convert_(row, reinterpret_cast<std::uint8_t*>(converted_.data()), width_, context_);
        return converted_.data();
    }
    for (std::int32_t x = 0; x < width_; ++x) {
        converted_[static_cast<std::size_t>(x)] = RowPixelToRGB(row, x, format_, context_.palette);
    }
    return converted_.data();
}

TRGB TZmRgbRows::GetPixel(std::int32_t x, std::int32_t y) {
    if (y != raw_y_) {
        raw_row_ = source_.GetScanLine(y);
        raw_y_ = y;
    }
    if (raw_row_ == nullptr) {
        return TRGB{};
    }
    if (format_ == zm24RGB) {
        return reinterpret_cast<const TRGB*>(raw_row_)[x];
    }
    return RowPixelToRGB(raw_row_, x, format_, context_.palette);
}

}  // namespace zm
