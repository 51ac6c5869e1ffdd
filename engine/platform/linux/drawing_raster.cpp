#include "engine/platform/linux/drawing_raster_p.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <new>

#include "engine/foundation/zmnumbers.h"

namespace zm::platform {
namespace {

constexpr std::int32_t kTileWidth = 4096;
constexpr std::int32_t kTileHeight = 512;

// Channels of a colour, blue first.
constexpr int kAlphaShift = 24;
constexpr int kColorShifts[] = {0, 8, 16};

std::uint32_t ChannelOf(TArgb color, int shift) {
    return (color >> shift) & 255;
}

/// A share of 255 of a value of up to 255, rounded to the nearest.
std::uint32_t Share255(std::uint32_t value, std::uint32_t share) {
    return (value * share + 127) / 255;
}

/// `weight` of 255 of a colour of the given alpha, the rest of a pixel; both with straight alpha:
/// channels are the mean by weight and alpha, rounded to the nearest. Over is the case of alpha
/// 255, its own alpha being part of the weight.
TArgb MixColors(TArgb pixel, TArgb color, std::uint32_t alpha, std::uint32_t weight) {
    const std::uint32_t color_share = alpha * weight;
    const std::uint32_t pixel_share = ChannelOf(pixel, kAlphaShift) * (255 - weight);
    const std::uint32_t total = color_share + pixel_share;
    if (total == 0) {
        return 0;
    }
    TArgb result = ((total + 127) / 255) << kAlphaShift;
    for (const int shift : kColorShifts) {
        const std::uint32_t sum =
            ChannelOf(color, shift) * color_share + ChannelOf(pixel, shift) * pixel_share;
        result |= ((sum + total / 2) / total) << shift;
    }
    return result;
}

/// The bitwise modes of the plain drawing.
TArgb CombineBits(std::int32_t mode, TArgb pen, TArgb pixel) {
    constexpr TArgb kColors = 0xFFFFFF;
    const auto combine = [&]() -> TArgb {
        switch (mode) {
            case 0: return 0;
            case 1: return kColors;
            case 3: return ~pixel;
            case 5: return ~pen;
            case 6: return pen | ~pixel;
            case 7: return pen & ~pixel;
            case 8: return ~pen | pixel;
            case 9: return ~pen & pixel;
            case 10: return pen | pixel;
            case 11: return ~(pen | pixel);
            case 12: return pen & pixel;
            case 13: return ~(pen & pixel);
            case 14: return pen ^ pixel;
            case 15: return ~(pen ^ pixel);
            default: return pen;
        }
    };
    return combine() & kColors;
}

TArgb CombinePixel(TCombining combining, TArgb pixel, TArgb color, std::uint32_t coverage) {
    const std::uint32_t alpha = ChannelOf(color, kAlphaShift);
    if (combining == kCombineOver) {
        const std::uint32_t weight = Share255(alpha, coverage);
        return weight == 0 ? pixel : MixColors(pixel, color, 255, weight);
    }
    if (combining == kCombineCopy) {
        return coverage == 255 ? color : MixColors(pixel, color, alpha, coverage);
    }
    constexpr std::int32_t kNothing = 2;
    const std::int32_t mode = combining - kPlainFirst;
    return mode == kNothing ? pixel : CombineBits(mode, color, pixel);
}

/// A library surface over a tile's pixels, as long as the tile is drawn on.
class TTileSurface {
public:
    TTileSurface(const TDrawingLibrary& library, TTile& tile, cairo_format_t format)
        : library_(library),
          surface_(library.cairo_image_surface_create_for_data(
              tile.mask, format, tile.area.right - tile.area.left, tile.area.bottom - tile.area.top,
              tile.mask_stride)),
          cairo_(library.cairo_create(surface_)) {
        tile.cairo = cairo_;
        library_.cairo_set_source_rgba(cairo_, 1, 1, 1, 1);
    }
    ~TTileSurface() {
        library_.cairo_destroy(cairo_);
        library_.cairo_surface_flush(surface_);
        library_.cairo_surface_destroy(surface_);
    }
    TTileSurface(const TTileSurface&) = delete;
    TTileSurface& operator=(const TTileSurface&) = delete;
    bool IsGood() const { return library_.cairo_status(cairo_) == CAIRO_STATUS_SUCCESS; }

private:
    const TDrawingLibrary& library_;
    cairo_surface_t* surface_;
    cairo_t* cairo_;
};

/// Whole pixels that a box touches, within a target.
TRect PixelsOf(const TDeviceBox& box, const TDeviceBox& bounds) {
    const TDeviceBox inner = Intersect(box, bounds);
    if (inner.IsEmpty()) {
        return {};
    }
    return {TruncToInt(std::floor(inner.left)), TruncToInt(std::floor(inner.top)),
            TruncToInt(std::ceil(inner.right)), TruncToInt(std::ceil(inner.bottom))};
}

}  // namespace

void TSolidPaint::ReadRow(std::int32_t, std::int32_t, std::int32_t count, TArgb* colors) {
    std::fill_n(colors, count, color_);
}

// Target rows.

TTargetRows::TTargetRows(const TDrawTarget& target) : target_(target) {
    const std::int32_t bits = target.bits_per_pixel;
    const bool has_colors = target.colors != nullptr && target.colors->size() >= 256;
    const bool is_known = bits == 24 || bits == 32 || (has_colors && (bits == 1 || bits == 8));
    if (is_known && target.section != nullptr && target.width > 0 && target.height > 0) {
        row_bytes_ = (std::int64_t{target.width} * bits + 31) / 32 * 4;
    }
}

std::uint8_t* TTargetRows::Row(std::int32_t y) const {
    return target_.section->Bits() + (target_.height - 1 - std::int64_t{y}) * row_bytes_;
}

void TTargetRows::ReadRow(std::int32_t x, std::int32_t y, std::int32_t count, TArgb* colors) const {
    const std::uint8_t* const row = Row(y);
    for (std::int32_t i = 0; i < count; ++i) {
        const std::int64_t column = std::int64_t{x} + i;
        switch (target_.bits_per_pixel) {
            case 32: {
                const std::uint8_t* const p = row + column * 4;
                colors[i] = MakeArgb(p[3], TRGB{p[0], p[1], p[2]});
                break;
            }
            case 24: {
                const std::uint8_t* const p = row + column * 3;
                colors[i] = MakeArgb(255, TRGB{p[0], p[1], p[2]});
                break;
            }
            case 8: colors[i] = MakeArgb(255, (*target_.colors)[row[column]]); break;
            default: {
                const unsigned bit = (row[column / 8] >> (7 - column % 8)) & 1U;
                colors[i] = MakeArgb(255, (*target_.colors)[bit]);
            }
        }
    }
}

/// The nearest colour of the table by the sum of squares; the first of equals.
std::size_t TTargetRows::NearestEntry(TArgb color) const {
    const std::size_t count = target_.bits_per_pixel == 1 ? 2 : 256;
    std::size_t best = 0;
    std::int32_t best_distance = kMaxInt32;
    for (std::size_t i = 0; i < count && best_distance > 0; ++i) {
        const TArgb entry = MakeArgb(255, (*target_.colors)[i]);
        std::int32_t distance = 0;
        for (const int shift : kColorShifts) {
            const auto difference = static_cast<std::int32_t>(ChannelOf(entry, shift)) -
                                    static_cast<std::int32_t>(ChannelOf(color, shift));
            distance += difference * difference;
        }
        if (distance < best_distance) {
            best = i;
            best_distance = distance;
        }
    }
    return best;
}

void TTargetRows::WriteRow(std::int32_t x, std::int32_t y, std::int32_t count, const TArgb* before,
                           const TArgb* colors) {
    std::uint8_t* const row = Row(y);
    TArgb last_color = 0;
    std::optional<std::size_t> last_entry;  // neighbours are mostly alike, and a look-up is long
    const auto entry_of = [&](TArgb color) {
        if (!last_entry || color != last_color) {
            last_color = color;
            last_entry = NearestEntry(color);
        }
        return *last_entry;
    };
    for (std::int32_t i = 0; i < count; ++i) {
        const std::int64_t column = std::int64_t{x} + i;
        const TArgb color = colors[i];
        if (color == before[i]) {
            continue;
        }
        if (target_.bits_per_pixel >= 24) {
            const std::int32_t bytes = target_.bits_per_pixel / 8;
            for (std::int32_t byte = 0; byte < bytes; ++byte) {
                row[column * bytes + byte] = static_cast<std::uint8_t>(color >> (8 * byte));
            }
        } else if (target_.bits_per_pixel == 8) {
            row[column] = static_cast<std::uint8_t>(entry_of(color));
        } else {
            const auto bit = static_cast<std::uint8_t>(0x80 >> (column % 8));
            std::uint8_t& byte = row[column / 8];
            byte = static_cast<std::uint8_t>(entry_of(color) != 0 ? byte | bit : byte & ~bit);
        }
    }
}

// Tiles.

TRaster::TRaster(const TDrawTarget& target, const TDrawingLibrary& library)
    : target_(target), library_(library), rows_(target) {}

TDeviceBox TRaster::Bounds() const {
    return {0, 0, static_cast<double>(target_.width), static_cast<double>(target_.height)};
}

bool TRaster::DrawTile(TTile& tile, cairo_format_t format, const TDrawCoverage& draw) {
    const TTileSurface surface(library_, tile, format);
    return draw(tile) && surface.IsGood();
}

template <typename TCompose>
bool TRaster::PaintTiles(const TDeviceBox& box, cairo_format_t format, const TDrawCoverage& draw,
                         TCompose compose) try {
    const TRect pixels = PixelsOf(box, Bounds());
    const std::int32_t pixel_bytes = format == CAIRO_FORMAT_A8 ? 1 : 4;
    for (std::int64_t y = pixels.top; y < pixels.bottom; y += kTileHeight) {
        for (std::int64_t x = pixels.left; x < pixels.right; x += kTileWidth) {
            const auto left = static_cast<std::int32_t>(x);
            const auto top = static_cast<std::int32_t>(y);
            TTile tile;
            tile.area = {left, top, left + std::min(kTileWidth, pixels.right - left),
                         top + std::min(kTileHeight, pixels.bottom - top)};
            tile.mask_stride = ((tile.area.right - left) * pixel_bytes + 3) / 4 * 4;
            buffer_.assign(static_cast<std::size_t>(tile.mask_stride) *
                               static_cast<std::size_t>(tile.area.bottom - top),
                           0);
            tile.mask = buffer_.data();
            if (!DrawTile(tile, format, draw)) {
                return false;
            }
            compose(tile);
            painted_pixels_ += std::int64_t{tile.area.right - left} * (tile.area.bottom - top);
        }
    }
    if (pixels.left < pixels.right) {
        const bool is_first = touched_.left >= touched_.right;
        touched_ = is_first ? pixels
                            : TRect{std::min(touched_.left, pixels.left),
                                    std::min(touched_.top, pixels.top),
                                    std::max(touched_.right, pixels.right),
                                    std::max(touched_.bottom, pixels.bottom)};
    }
    return true;
} catch (const std::bad_alloc&) {
    return false;
}

bool TRaster::Paint(const TDeviceBox& box, TPaint& paint, TCombining combining,
                    const TDrawCoverage& draw) {
    return PaintTiles(box, CAIRO_FORMAT_A8, draw,
                      [&](const TTile& tile) { ComposeMask(tile, paint, combining); });
}

bool TRaster::PaintColors(const TDeviceBox& box, std::uint8_t alpha, TCombining combining,
                          const TDrawCoverage& draw) {
    return PaintTiles(box, CAIRO_FORMAT_ARGB32, draw,
                      [&](const TTile& tile) { ComposeColors(tile, alpha, combining); });
}

void TRaster::ComposeMask(const TTile& tile, TPaint& paint, TCombining combining) {
    const std::int32_t width = tile.area.right - tile.area.left;
    colors_.resize(static_cast<std::size_t>(width));
    for (std::int32_t y = tile.area.top; y < tile.area.bottom; ++y) {
        const std::uint8_t* const mask =
            tile.mask + std::ptrdiff_t{y - tile.area.top} * tile.mask_stride;
        if (std::any_of(mask, mask + width, [](std::uint8_t value) { return value != 0; })) {
            coverage_.assign(mask, mask + width);
            paint.ReadRow(tile.area.left, y, width, colors_.data());
            ComposeRow(tile, y, combining);
        }
    }
}

void TRaster::ComposeColors(const TTile& tile, std::uint8_t alpha, TCombining combining) {
    const auto width = static_cast<std::size_t>(tile.area.right - tile.area.left);
    coverage_.resize(width);
    colors_.resize(width);
    for (std::int32_t y = tile.area.top; y < tile.area.bottom; ++y) {
        const std::uint8_t* const row =
            tile.mask + std::ptrdiff_t{y - tile.area.top} * tile.mask_stride;
        if (std::all_of(row, row + width * 4, [](std::uint8_t value) { return value == 0; })) {
            continue;
        }
        for (std::size_t i = 0; i < width; ++i) {
            // The library's colours are multiplied by their alpha, in native words.
            TArgb color = 0;
            std::copy_n(row + i * 4, sizeof(color), reinterpret_cast<std::uint8_t*>(&color));
            const std::uint32_t coverage = ChannelOf(color, kAlphaShift);
            coverage_[i] = static_cast<std::uint8_t>(coverage);
            colors_[i] = static_cast<TArgb>(alpha) << kAlphaShift;
            for (const int shift : kColorShifts) {
                const std::uint32_t divisor = std::max(coverage, 1U);
                const std::uint32_t value = (ChannelOf(color, shift) * 255 + divisor / 2) / divisor;
                colors_[i] |= std::min(value, 255U) << shift;
            }
        }
        ComposeRow(tile, y, combining);
    }
}

/// Lays colours_ by coverage_ on a row.
void TRaster::ComposeRow(const TTile& tile, std::int32_t y, TCombining combining) {
    const std::size_t width = coverage_.size();
    before_.resize(width);
    rows_.ReadRow(tile.area.left, y, static_cast<std::int32_t>(width), before_.data());
    after_ = before_;
    for (std::size_t i = 0; i < width; ++i) {
        if (coverage_[i] != 0) {
            after_[i] = CombinePixel(combining, before_[i], colors_[i], coverage_[i]);
        }
    }
    rows_.WriteRow(tile.area.left, y, static_cast<std::int32_t>(width), before_.data(),
                   after_.data());
}

// Figures.

void AddFigures(const TDrawingLibrary& library, const TTile& tile,
                const std::vector<TPolyline>& figures, double offset) {
    const double dx = offset - tile.area.left;
    const double dy = offset - tile.area.top;
    library.cairo_identity_matrix(tile.cairo);
    library.cairo_new_path(tile.cairo);
    for (const TPolyline& figure : figures) {
        bool is_first = true;
        for (const TDevicePoint& point : figure.points) {
            const auto add = is_first ? library.cairo_move_to : library.cairo_line_to;
            add(tile.cairo, point.x + dx, point.y + dy);
            is_first = false;
        }
        if (figure.is_closed) {
            library.cairo_close_path(tile.cairo);
        }
    }
}

bool FillFigures(const TDrawingLibrary& library, const TTile& tile,
                 const std::vector<TPolyline>& figures, TMaskEdges edges, cairo_fill_rule_t rule) {
    AddFigures(library, tile, CutPolygons(figures, Enlarge(BoxOf(tile.area), kCutMargin)),
               /*offset=*/0);
    library.cairo_set_antialias(
        tile.cairo, edges == TMaskEdges::kSmooth ? CAIRO_ANTIALIAS_GRAY : CAIRO_ANTIALIAS_NONE);
    library.cairo_set_fill_rule(tile.cairo, rule);
    library.cairo_fill(tile.cairo);
    return true;
}

}  // namespace zm::platform
