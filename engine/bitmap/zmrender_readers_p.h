#pragma once

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <vector>

#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmxBitmaps.h"

/// Readers of the pixel transfer: how a pixel of each format becomes RGB on the way to a
/// destination. Made once a drawing; set-up is theirs, so that no pixel tests a setting.
///
/// A reader has `Read` for one pixel and `ReadRow` for the pixels of a table of columns. For
/// columns that follow one another from `first` on it may have `FindRun`, the address of pixels
/// that need no reading, and `ReadRun`; nil and False where it has not.
/// `source_y` is the number of the source row that `row` points to.
namespace zm {

/// One channel of zm24RGB or zm48RGB by the display adjustments: offset and contrast, then the
/// display range. `contrast` as TZmBitmapRendering has it; `offset` 0 where offsets are off.
std::uint8_t AdjustChannel(std::uint8_t value, std::int32_t offset, std::int32_t contrast,
                           double black, double white);

/// A grey of `black` to `white` stretched over all bytes; `low` and `high` limit it first.
std::uint8_t StretchGray(double value, double low, double high, double black, double white);

/// Bytes of the greys 0 to count - 1 by the display range; the high byte without one.
std::vector<std::uint8_t> MakeGrayTable(std::int32_t count, double black, double white);

template <typename Reader>
class TPixelReader {
public:
    void ReadRow(const std::uint8_t* row, const std::int32_t* columns, std::int32_t width,
                 std::int32_t source_y, TRGB* colors) const {
        const auto& reader = static_cast<const Reader&>(*this);
        for (std::int32_t x = 0; x < width; ++x) {
            colors[x] = reader.Read(row, columns[x], source_y);
        }
    }
    const TRGB* FindRun(const std::uint8_t*, std::int32_t) const { return nullptr; }
    bool ReadRun(const std::uint8_t*, std::int32_t, std::int32_t, TRGB*) const { return false; }
};

class TBitReader : public TPixelReader<TBitReader> {
public:
    TRGB Read(const std::uint8_t* row, std::int32_t column, std::int32_t) const {
        const bool is_set = (row[column >> 3] >> (7 - (column & 7)) & 1) != 0;
        return is_set ? TRGB{255, 255, 255} : TRGB{};
    }
};

/// zm8p; entries behind a short palette are black.
class TPaletteReader : public TPixelReader<TPaletteReader> {
public:
    explicit TPaletteReader(const std::vector<TRGB>& palette) {
        for (std::size_t i = 0; i < std::min(palette.size(), colors_.size()); ++i) {
            colors_[i] = palette[i];
        }
    }
    TRGB Read(const std::uint8_t* row, std::int32_t column, std::int32_t) const {
        return colors_[row[column]];
    }

private:
    std::array<TRGB, 256> colors_{};
};

/// zm8g and zm16g.
template <typename Sample>
class TGrayReader : public TPixelReader<TGrayReader<Sample>> {
public:
    TGrayReader(double black, double white)
        : table_(MakeGrayTable(sizeof(Sample) == 1 ? 256 : 65536, black, white)) {}
    TRGB Read(const std::uint8_t* row, std::int32_t column, std::int32_t) const {
        Sample value = 0;
        std::memcpy(&value, row + std::int64_t{column} * std::int64_t{sizeof value}, sizeof value);
        const std::uint8_t gray = table_[value];
        return TRGB{gray, gray, gray};
    }

private:
    std::vector<std::uint8_t> table_;
};

/// zm32f; without a range 0 to 1.
class TFloatReader : public TPixelReader<TFloatReader> {
public:
    TFloatReader(double black, double white)
        : black_(black == white ? 0.0 : black), white_(black == white ? 1.0 : white) {}
    TRGB Read(const std::uint8_t* row, std::int32_t column, std::int32_t) const {
        float value = 0;
        std::memcpy(&value, row + std::int64_t{column} * 4, sizeof value);
        const std::uint8_t gray =
            StretchGray(value == value ? value : 0.0, std::min(black_, white_),
                        std::max(black_, white_), black_, white_);
        return TRGB{gray, gray, gray};
    }

private:
    double black_;
    double white_;
};

/// zm24RGB, zm32RGB and zm48RGB, of which the first two have three bytes in the order blue,
/// green, red and the third words in the order red, green, blue.
template <TZmPixelFormat kFormat>
class TColorReader : public TPixelReader<TColorReader<kFormat>> {
public:
    /// Without adjustments.
    TColorReader() : is_adjusting_(false) {
        for (std::size_t i = 0; i < 256; ++i) {
            red_[i] = green_[i] = blue_[i] = static_cast<std::uint8_t>(i);
        }
    }
    explicit TColorReader(const TZmBitmapRendering& source) : TColorReader() {
        const bool has_offset = source.GetEnableChannelOffset();
        const std::int32_t contrast = source.GetContrast();
        const double black = source.GetBlackValue();
        const double white = source.GetWhiteValue();
        is_adjusting_ = has_offset || contrast != 0 || black != white;
        TTable* const tables[] = {&red_, &green_, &blue_};
        for (std::size_t channel = 0; channel < 3 && is_adjusting_; ++channel) {
            const std::int32_t offset = has_offset ? source.GetChannelOffset(channel) : 0;
            for (std::uint8_t& value : *tables[channel]) {
                value = AdjustChannel(value, offset, contrast, black, white);
            }
        }
    }
    TRGB Read(const std::uint8_t* row, std::int32_t column, std::int32_t) const {
        const std::uint8_t* const pixel = row + column * kBytes;
        if constexpr (kFormat == zm48RGB) {
            return TRGB{blue_[pixel[5]], green_[pixel[3]], red_[pixel[1]]};  // high bytes
        } else {
            return TRGB{blue_[pixel[0]], green_[pixel[1]], red_[pixel[2]]};
        }
    }
    const TRGB* FindRun(const std::uint8_t* row, std::int32_t first) const {
        return kFormat == zm24RGB && !is_adjusting_ ? reinterpret_cast<const TRGB*>(row) + first
                                                    : nullptr;
    }
    bool ReadRun(const std::uint8_t* row, std::int32_t first, std::int32_t width,
                 TRGB* colors) const {
        if constexpr (kFormat != zm24RGB) {
            if (!is_adjusting_) {
                FindRowFunction(kFormat, zm24RGB)(row + first * kBytes,
                                                  reinterpret_cast<std::uint8_t*>(colors), width,
                                                  TZmRowContext{});
                return true;
            }
        }
        return false;
    }

private:
    static constexpr std::int64_t kBytes = kFormat == zm24RGB ? 3 : kFormat == zm32RGB ? 4 : 6;
    using TTable = std::array<std::uint8_t, 256>;
    bool is_adjusting_;
    TTable red_{};
    TTable green_{};
    TTable blue_{};
};

/// zmCMYK and zmCIELab, by the row conversions. The fast form gathers a row's pixels and converts
/// them in one call, since a colour transform counts by calls.
template <std::int64_t kBytes>
class TConvertingReader : public TPixelReader<TConvertingReader<kBytes>> {
public:
    explicit TConvertingReader(TZmPixelFormat format)
        : convert_(FindRowFunction(format, zm24RGB)), context_(MakeRowContext(nullptr)) {}
    TRGB Read(const std::uint8_t* row, std::int32_t column, std::int32_t) const {
        TRGB color;
        convert_(row + column * kBytes, reinterpret_cast<std::uint8_t*>(&color), 1, context_);
        return color;
    }
    void ReadRow(const std::uint8_t* row, const std::int32_t* columns, std::int32_t width,
                 std::int32_t, TRGB* colors) const {
        constexpr std::int32_t kRun = 256;
        std::array<std::uint8_t, kRun * kBytes> pixels;
        for (std::int32_t x = 0; x < width; x += kRun) {
            const std::int32_t count = std::min(width - x, kRun);
            for (std::int32_t i = 0; i < count; ++i) {
                std::memcpy(pixels.data() + i * kBytes, row + columns[x + i] * kBytes, kBytes);
            }
            convert_(pixels.data(), reinterpret_cast<std::uint8_t*>(colors + x), count, context_);
        }
    }

private:
    TZmRowFunction convert_;
    TZmRowContext context_;
};

/// Any format, without adjustments.
class TAnyReader : public TPixelReader<TAnyReader> {
public:
    explicit TAnyReader(TZmBitmap& source) : source_(source) {}
    TRGB Read(const std::uint8_t*, std::int32_t column, std::int32_t source_y) const {
        return source_.GetPixels(column, source_y);
    }

private:
    TZmBitmap& source_;
};

}  // namespace zm
