#include "engine/bitmap/zmplatformbitmap.h"

#include <new>

#include "engine/bitmap/zmdib.h"
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

/// Zeroed pixels, or nil without room.
std::unique_ptr<platform::TDibSection> MakeSection(std::int32_t width, std::int32_t height,
                                                   std::int32_t bits, std::int64_t size_bytes) {
    try {
        // With colours from the start: the system makes the table as long as the header says.
        const std::vector<TRGB> colors(bits == 8 ? 256 : bits == 1 ? 2 : 0);
        const auto info = MakeDibInfo(width, height, bits, colors, /*dpi_x=*/0, /*dpi_y=*/0);
        return platform::TDibSection::Create(info.data(), static_cast<std::size_t>(size_bytes));
    } catch (const std::bad_alloc&) {
        return nullptr;
    }
}

}  // namespace

bool TBitmap::SetSize(std::int32_t width, std::int32_t height, TBitmapPixelFormat format) {
    width_ = 0;
    height_ = 0;
    row_len_ = 0;
    format_ = pfNone;
    section_.reset();
    ++generation_;
    const auto row_len = CalcRowLen(width, BitsOf(format), kRowAlignmentBits);
    if (width < 1 || height < 1 || !row_len) {
        return false;
    }
    const std::int64_t size_bytes = *row_len * height;
    if (FitsAddressSpace(size_bytes)) {
        section_ = MakeSection(width, height, BitsOf(format), size_bytes);
    }
    if (section_ == nullptr) {
        return false;
    }
    width_ = width;
    height_ = height;
    row_len_ = *row_len;
    format_ = format;
    if (format == pf1bit && color_table_[0] == color_table_[1]) {
        color_table_[0] = TRGB{0, 0, 0};  // drawing needs two colours to tell apart
        color_table_[1] = TRGB{255, 255, 255};
    }
    return true;
}

std::uint8_t* TBitmap::GetScanLine(std::int32_t row) {
    if (row < 0 || row >= height_) {
        return nullptr;
    }
    return section_->Bits() + (height_ - row - 1) * row_len_;
}

platform::TDrawTarget TBitmap::GetDrawTarget() {
    return {section_.get(), width_, height_, BitsOf(format_), &color_table_};
}

}  // namespace zm
