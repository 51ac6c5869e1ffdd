#include "engine/bitmap/zmplatformbitmap.h"

#include <new>
#include <stdexcept>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kRowAlignmentBits = 32;

std::int32_t BitsOf(TBitmapPixelFormat format) {
    switch (format) {
        case pf1bit: return 1;
        case pf8bit: return 8;
        case pf24bit: return 24;
        case pf32bit: return 32;
        default: return 0;
    }
}

/// Zeroed bytes, or none without room.
std::vector<std::uint8_t> MakePixels(std::int64_t size_bytes) {
    try {
        return std::vector<std::uint8_t>(static_cast<std::size_t>(size_bytes));
    } catch (const std::bad_alloc&) {
        return {};
    } catch (const std::length_error&) {
        return {};
    }
}

}  // namespace

bool TBitmap::SetSize(std::int32_t width, std::int32_t height, TBitmapPixelFormat format) {
    width_ = 0;
    height_ = 0;
    row_len_ = 0;
    format_ = pfNone;
    pixels_ = {};
    const auto row_len = CalcRowLen(width, BitsOf(format), kRowAlignmentBits);
    if (width < 1 || height < 1 || !row_len) {
        return false;
    }
    const std::int64_t size_bytes = *row_len * height;
    if (FitsAddressSpace(size_bytes)) {
        pixels_ = MakePixels(size_bytes);
    }
    if (pixels_.empty()) {
        return false;
    }
    width_ = width;
    height_ = height;
    row_len_ = *row_len;
    format_ = format;
    return true;
}

std::uint8_t* TBitmap::GetScanLine(std::int32_t row) {
    if (row < 0 || row >= height_) {
        return nullptr;
    }
    return pixels_.data() + (height_ - row - 1) * row_len_;
}

}  // namespace zm
