/// A picture with an alpha byte laid over an image of any format.
///
/// One picture over another: a pixel of colour s and alpha a (0 to 255) over one of colour d and
/// alpha b gives
///
///     alpha   = (255 a + 255 b - a b) / 255
///     colour  = (255 a s + (255 - a) b d) / (255 a + 255 b - a b)
///
/// each rounded to the nearest integer, the half upward. So a pixel over a transparent one keeps
/// its own colour, alpha 255 replaces what lies below and alpha 0 leaves it. Over an opaque pixel
/// the colour is (a s + (255 - a) d) / 255. No product exceeds 255 x 255 x 255.

#include <algorithm>
#include <array>
#include <optional>

#include "engine/bitmap/zmcopyspan_p.h"
#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kOpaque = 255;
/// Formats other than the two that are mixed in place go through RGB in runs of this length, in
/// a buffer on the stack: merging also happens in a destructor, where nothing may be allocated.
constexpr std::int32_t kRunPixels = 256;

/// What becomes of each alpha byte.
using TAlphaTable = std::array<std::uint8_t, 256>;

TAlphaTable MakeAlphaTable(std::int32_t transparency, double opacity) {
    const std::int32_t ceiling = std::clamp(transparency, 0, kOpaque);
    const double factor = std::clamp(opacity, 0.0, 1.0);
    TAlphaTable table{};
    for (std::int32_t alpha = 0; alpha <= kOpaque; ++alpha) {
        table[static_cast<std::size_t>(alpha)] =
            Clamp8(TruncToInt(std::min(alpha, ceiling) * factor));
    }
    return table;
}

std::uint8_t DivideRounded(std::int32_t dividend, std::int32_t divisor) {
    return static_cast<std::uint8_t>((dividend + divisor / 2) / divisor);
}

/// The alpha of both together, times 255.
std::int32_t JointAlpha(std::int32_t upper, std::int32_t lower) {
    return kOpaque * (upper + lower) - upper * lower;
}

/// `pixel` is blue, green, red; `upper` is not 0.
void MergePixel(std::uint8_t* pixel, TRGBA source, std::int32_t upper, std::int32_t lower) {
    const std::int32_t weight = upper * kOpaque;
    const std::int32_t rest = (kOpaque - upper) * lower;
    pixel[0] = DivideRounded(source.b * weight + pixel[0] * rest, weight + rest);
    pixel[1] = DivideRounded(source.g * weight + pixel[1] * rest, weight + rest);
    pixel[2] = DivideRounded(source.r * weight + pixel[2] * rest, weight + rest);
}

/// `plane` is the alpha of the pixels below, or nil where they are opaque.
void MergePixels(const TRGBA* source, const TAlphaTable& alphas, std::uint8_t* pixels,
                 std::int32_t pixel_bytes, std::uint8_t* plane, std::int32_t count) {
    for (std::int32_t i = 0; i < count; ++i, pixels += pixel_bytes) {
        const std::int32_t upper = alphas[source[i].a];
        if (upper == 0) {
            continue;
        }
        const std::int32_t lower = plane == nullptr ? kOpaque : plane[i];
        MergePixel(pixels, source[i], upper, lower);
        if (plane != nullptr) {
            plane[i] = DivideRounded(JointAlpha(upper, lower), kOpaque);
        }
    }
}

/// Through RGB and back, for the pixels alone that something covers: a way through eight bits
/// would cost the others their depth.
void MergeRuns(const TRGBA* source, const TAlphaTable& alphas, std::uint8_t* row, std::int32_t x,
               const TZmRowLayout& layout, std::uint8_t* plane, std::int32_t count) {
    std::array<TRGB, kRunPixels> buffer;
    std::int32_t first = 0;
    while (first < count) {
        std::int32_t end = first;
        while (end < count && end - first < kRunPixels && alphas[source[end].a] != 0) {
            ++end;
        }
        if (end > first) {
            LoadRGBPixels(row, x + first, end - first, layout, buffer.data());
            MergePixels(source + first, alphas, &buffer.front().b, sizeof(TRGB),
                        plane == nullptr ? nullptr : plane + first, end - first);
            StoreRGBPixels(buffer.data(), row, x + first, end - first, layout);
        }
        first = std::max(end, first + 1);
    }
}

/// What the rows of one merge share.
struct TMergeRows {
    TAlphaTable alphas;
    TZmRowLayout layout;
    std::int32_t x = 0;  ///< first column of the image
    std::int32_t count = 0;
    std::int32_t plane_count = 0;  ///< columns of these that the plane has
};

/// Merges pixels from a column on that all have, or all lack, a place in the plane.
void MergeSpan(const TMergeRows& rows, const TRGBA* source, std::uint8_t* row, std::int32_t x,
               std::uint8_t* plane, std::int32_t count) {
    const TZmPixelFormat format = rows.layout.format;
    if (format == zm24RGB || format == zm32RGB) {
        const std::int32_t pixel_bytes = format == zm24RGB ? 3 : 4;
        MergePixels(source, rows.alphas, row + std::int64_t{x} * pixel_bytes, pixel_bytes, plane,
                    count);
    } else {
        MergeRuns(source, rows.alphas, row, x, rows.layout, plane, count);
    }
}

/// `alpha_row` is the row of the plane, nil where it has none.
void MergeRow(const TMergeRows& rows, const TRGBA* source, std::uint8_t* row,
              std::uint8_t* alpha_row) {
    const std::int32_t covered = alpha_row == nullptr ? 0 : rows.plane_count;
    if (covered > 0) {
        MergeSpan(rows, source, row, rows.x, alpha_row + rows.x, covered);
    }
    MergeSpan(rows, source + covered, row, rows.x + covered, nullptr, rows.count - covered);
}

}  // namespace

// The fourth byte of a zm32RGB image stays: what it means is its owner's affair, the image's
// transparency is the plane. A plane may be smaller than its image; pixels beyond it are opaque.
void TZmBitmapSurface::MergeWithAlpha(TZmBitmap* Bitmap, std::int32_t DstX, std::int32_t DstY,
                                      std::int32_t Transparency, double Opacity) {
    auto& image = static_cast<TZmBitmap&>(*this);
    if (Bitmap == nullptr || Bitmap->GetPixelFormat() != zm32RGB || Bitmap->IsEmpty() ||
        image.IsEmpty() || image.GetIsVirtual()) {
        return;
    }
    const auto columns = ClipCopySpan({0, DstX, Bitmap->GetWidth()}, Bitmap->GetWidth(), fWidth);
    const auto lines = ClipCopySpan({0, DstY, Bitmap->GetHeight()}, Bitmap->GetHeight(), fHeight);
    if (!columns || !lines) {
        return;
    }
    TZmBitmap* const plane = fAlphaChannel.get();
    TMergeRows rows{MakeAlphaTable(Transparency, Opacity), image.GetRowLayout(),
                    static_cast<std::int32_t>(columns->dest),
                    static_cast<std::int32_t>(columns->length)};
    if (plane != nullptr && plane->GetPixelFormat() == zm8g) {
        rows.plane_count = std::clamp(plane->GetWidth() - rows.x, 0, rows.count);
    }
    for (std::int64_t i = 0; i < lines->length; ++i) {
        const auto y = static_cast<std::int32_t>(lines->dest + i);
        const auto source_y = static_cast<std::int32_t>(lines->source + i);
        const bool has_plane_row = rows.plane_count > 0 && y < plane->GetHeight();
        std::uint8_t* const alpha_row = has_plane_row ? plane->GetScanLine(y) : nullptr;
        const std::uint8_t* const from = Bitmap->GetRow(source_y);
        std::uint8_t* const row = image.GetRow(y);
        if (from != nullptr && row != nullptr) {
            const auto* const source = reinterpret_cast<const TRGBA*>(from) + columns->source;
            MergeRow(rows, source, row, alpha_row);
        }
        image.FreeRow(y);
        Bitmap->FreeRow(source_y);
    }
    image.Changed();
}

}  // namespace zm
