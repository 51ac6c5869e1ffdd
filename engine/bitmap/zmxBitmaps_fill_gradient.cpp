/// Gradients: one table of pixels along the way, of which each row shows a window.

#include <algorithm>
#include <cstring>
#include <new>
#include <type_traits>
#include <vector>

#include "engine/bitmap/zmgradient_p.h"
#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

/// The places of a rectangle's pixels on the way of a gradient, 0 to `length`.
class TGradientWay {
public:
    TGradientWay(const TRect& rect, TZmGradientDirection direction)
        : rect_(rect), direction_(direction) {}

    std::int64_t Length() const {
        const std::int64_t columns = std::int64_t{rect_.right} - rect_.left;
        const std::int64_t lines = std::int64_t{rect_.bottom} - rect_.top;
        switch (direction_) {
            case zmgHorizontal: return columns;
            case zmgVertical: return lines;
            default: return columns + lines;
        }
    }

    std::int64_t PlaceOf(std::int32_t x, std::int32_t y) const {
        const std::int64_t column = std::int64_t{x} - rect_.left;
        const std::int64_t line = std::int64_t{y} - rect_.top;
        switch (direction_) {
            case zmgHorizontal: return column;
            case zmgVertical: return line;
            case zmgDiagonal2: return std::int64_t{rect_.right} - x + line;
            default: return column + line;
        }
    }

    /// Change of the place from one column to the next.
    int Step() const { return direction_ == zmgVertical ? 0 : direction_ == zmgDiagonal2 ? -1 : 1; }

private:
    TRect rect_;
    TZmGradientDirection direction_;
};

/// A channel at place / length of the way from `start` to `end`.
template <typename T>
T ChannelAt(T start, T end, std::int64_t place, std::int64_t length) {
    if (length == 0) {
        return start;
    }
    const double way = (static_cast<double>(end) - static_cast<double>(start)) *
                       static_cast<double>(place) / static_cast<double>(length);
    if constexpr (std::is_floating_point_v<T>) {
        return static_cast<T>(start + way);
    } else {
        return static_cast<T>(RoundHalfEven(start + way));
    }
}

template <typename T>
void WriteChannels(const std::uint8_t* start, const std::uint8_t* end, std::uint8_t* pixel,
                   std::size_t bytes, std::int64_t place, std::int64_t length) {
    for (std::size_t i = 0; i < bytes; i += sizeof(T)) {
        T first;
        T last;
        std::memcpy(&first, start + i, sizeof(T));
        std::memcpy(&last, end + i, sizeof(T));
        const T value = ChannelAt(first, last, place, length);
        std::memcpy(pixel + i, &value, sizeof(T));
    }
}

void WriteGradientPixel(TZmPixelFormat format, const TZmPixelBytes& start, const TZmPixelBytes& end,
                        std::uint8_t* pixel, std::int64_t place, std::int64_t length) {
    const auto bytes = static_cast<std::size_t>(PixelFormatInfo(format).bit_count) / 8;
    switch (format) {
        case zm16g:
        case zm48RGB:
            WriteChannels<std::uint16_t>(start.data(), end.data(), pixel, bytes, place, length);
            break;
        case zm32f:
            WriteChannels<float>(start.data(), end.data(), pixel, bytes, place, length);
            break;
        case zmCIELab:
            WriteChannels<std::uint8_t>(start.data(), end.data(), pixel, 1, place, length);
            WriteChannels<std::int8_t>(start.data() + 1, end.data() + 1, pixel + 1, 2, place,
                                       length);
            break;
        default: WriteChannels<std::uint8_t>(start.data(), end.data(), pixel, bytes, place, length);
    }
}

/// Bytes of pixels of a gradient, of which a long row of bits can ask for more than there can be.
std::size_t BytesOfPixels(std::int64_t count, std::size_t pixel_bytes) {
    const std::int64_t bytes = count * static_cast<std::int64_t>(pixel_bytes);
    if (!FitsAddressSpace(bytes)) {
        throw std::bad_alloc();
    }
    return static_cast<std::size_t>(bytes);
}

/// The pixels of all places that a rectangle's visible part has, ordered for rows: falling along
/// a row where the way leads to the left.
class TGradientTable {
public:
    TGradientTable(TZmPixelFormat format, const TGradientWay& way, const TRect& visible,
                   const TZmPixelBytes& start, const TZmPixelBytes& end)
        : pixel_bytes_(static_cast<std::size_t>(PixelFormatInfo(format).bit_count) / 8),
          way_(way),
          step_(way.Step()) {
        const std::int64_t corners[] = {
            way.PlaceOf(visible.left, visible.top), way.PlaceOf(visible.right, visible.top),
            way.PlaceOf(visible.left, visible.bottom), way.PlaceOf(visible.right, visible.bottom)};
        const auto [low, high] = std::minmax_element(std::begin(corners), std::end(corners));
        first_ = step_ < 0 ? *high : *low;
        bytes_.resize(BytesOfPixels(*high - *low + 1, pixel_bytes_));
        std::int64_t place = first_;
        for (std::size_t i = 0; i < bytes_.size(); i += pixel_bytes_) {
            WriteGradientPixel(format, start, end, bytes_.data() + i, place, way.Length());
            place += step_ < 0 ? -1 : 1;
        }
    }

    /// `width` pixels of row `y` from column x on. `buffer` serves rows of one pixel.
    const std::uint8_t* Row(std::int32_t x, std::int32_t y, std::int32_t width,
                            std::vector<std::uint8_t>& buffer) const {
        const std::int64_t place = way_.PlaceOf(x, y);
        const auto index = static_cast<std::size_t>(step_ < 0 ? first_ - place : place - first_);
        const std::uint8_t* const pixel = bytes_.data() + index * pixel_bytes_;
        if (step_ != 0) {
            return pixel;
        }
        buffer.resize(BytesOfPixels(width, pixel_bytes_));
        for (std::size_t i = 0; i < buffer.size(); i += pixel_bytes_) {
            std::memcpy(buffer.data() + i, pixel, pixel_bytes_);
        }
        return buffer.data();
    }

private:
    std::size_t pixel_bytes_;
    const TGradientWay& way_;
    int step_;
    std::int64_t first_ = 0;
    std::vector<std::uint8_t> bytes_;
};

/// How pixels from RGB are stored in a bitmap without whole channels.
TZmRowLayout IndexLayout(TZmBitmap& bitmap) {
    TZmRowLayout layout;
    layout.format = bitmap.GetPixelFormat();
    layout.palette_used = bitmap.GetPaletteUsed();
    if (bitmap.GetPaletteArray().size() >= 256) {
        layout.palette = bitmap.GetPaletteArray().data();
    }
    layout.context = MakeRowContext(nullptr);
    return layout;
}

TZmPixelBytes PixelOfColor(TColor color, TZmPixelFormat format) {
    const TRGB rgb = RGBFromColor(color);
    TZmPixelBytes pixel{};
    const TZmRowFunction convert = FindRowFunction(zm24RGB, format);
    if (convert != nullptr && format != zm1g && format != zm8p) {
        convert(reinterpret_cast<const std::uint8_t*>(&rgb), pixel.data(), 1,
                MakeRowContext(nullptr));
    } else {
        std::memcpy(pixel.data(), &rgb, sizeof rgb);
    }
    return pixel;
}

}  // namespace

void FillGradient(TZmBitmap& bitmap, const TRect& rect, TZmGradientDirection direction,
                  const TZmPixelBytes& start, const TZmPixelBytes& end) {
    const TRect visible{std::max(rect.left, 0), std::max(rect.top, 0),
                        std::min(rect.right, bitmap.GetWidth() - 1),
                        std::min(rect.bottom, bitmap.GetHeight() - 1)};
    if (bitmap.IsEmpty() || bitmap.GetIsVirtual() || visible.left > visible.right ||
        visible.top > visible.bottom) {
        return;
    }
    const TZmPixelFormat format = bitmap.GetPixelFormat();
    const bool is_from_rgb = format == zm1g || format == zm8p;
    const TZmPixelFormat table_format = is_from_rgb ? zm24RGB : format;
    const auto pixel_bytes = static_cast<std::size_t>(PixelFormatInfo(table_format).bit_count) / 8;
    const TGradientWay way(rect, direction);
    const TGradientTable table(table_format, way, visible, start, end);
    const TZmRowLayout layout = is_from_rgb ? IndexLayout(bitmap) : TZmRowLayout{};
    const std::int32_t width = visible.right - visible.left + 1;
    std::vector<std::uint8_t> buffer;
    for (std::int32_t y = visible.top; y <= visible.bottom; ++y) {
        const std::uint8_t* const pixels = table.Row(visible.left, y, width, buffer);
        std::uint8_t* const line = bitmap.GetScanLine(y);
        if (is_from_rgb) {
            StoreRGBPixels(reinterpret_cast<const TRGB*>(pixels), line, visible.left, width,
                           layout);
        } else {
            std::memcpy(line + static_cast<std::size_t>(visible.left) * pixel_bytes, pixels,
                        static_cast<std::size_t>(width) * pixel_bytes);
        }
    }
    bitmap.SetFull(false);
}

void TZmBitmap::GradientFill(TColor start_color, TColor end_color, TZmGradientDirection direction) {
    GradientFillRect(0, 0, GetWidth() - 1, fHeight - 1, start_color, end_color, direction);
}

void TZmBitmap::GradientFillRect(std::int32_t x1, std::int32_t y1, std::int32_t x2, std::int32_t y2,
                                 TColor start_color, TColor end_color,
                                 TZmGradientDirection direction) {
    const TZmPixelFormat format = GetPixelFormat();
    FillGradient(*this, TRect{x1, y1, x2, y2}, direction, PixelOfColor(start_color, format),
                 PixelOfColor(end_color, format));
}

}  // namespace zm
