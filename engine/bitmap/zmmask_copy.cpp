/// Pixels written through a mask, and masks lowered by an alpha plane.

#include <algorithm>
#include <cstring>
#include <vector>

#include "engine/bitmap/zmcopyspan_p.h"
#include "engine/bitmap/zmmask.h"
#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmxBitmaps.h"

namespace zm {
namespace {

constexpr std::int32_t kTakeBitFrom = 128;

/// `a` mixed with `b` by a weight of 0 to 255, rounded to the nearest. Both have 16 bits or are
/// signed bytes; the shift by 256 keeps the division on the positive side.
std::int32_t Mix(std::int32_t a, std::int32_t b, std::int32_t weight) {
    return (a * (255 - weight) + b * weight + 127 + 256 * 255) / 255 - 256;
}

// Rows. `weights` has one byte a pixel; source and destination start at their first pixel.

template <typename T>
T Load(const std::uint8_t* address) {
    T value;
    std::memcpy(&value, address, sizeof(T));
    return value;
}

template <typename T>
void Store(std::uint8_t* address, T value) {
    std::memcpy(address, &value, sizeof(T));
}

template <typename T, int Channels>
void MixRow(const std::uint8_t* source, std::uint8_t* dest, const std::uint8_t* weights,
            std::int32_t width) {
    for (std::int32_t x = 0; x < width; ++x) {
        for (int channel = 0; channel < Channels; ++channel) {
            Store(dest, static_cast<T>(Mix(Load<T>(dest), Load<T>(source), weights[x])));
            source += sizeof(T);
            dest += sizeof(T);
        }
    }
}

void MixFloatRow(const std::uint8_t* source, std::uint8_t* dest, const std::uint8_t* weights,
                 std::int32_t width) {
    for (std::int32_t x = 0; x < width; ++x) {
        const auto to = Load<float>(source + 4 * std::int64_t{x});
        const auto from = Load<float>(dest + 4 * std::int64_t{x});
        if (weights[x] == 255) {
            Store(dest + 4 * std::int64_t{x}, to);
        } else if (weights[x] != 0) {
            const float rate = static_cast<float>(weights[x]) / 255.0f;
            Store(dest + 4 * std::int64_t{x}, from + (to - from) * rate);
        }
    }
}

void MixLabRow(const std::uint8_t* source, std::uint8_t* dest, const std::uint8_t* weights,
               std::int32_t width) {
    for (std::int32_t x = 0; x < width; ++x) {
        MixRow<std::uint8_t, 1>(source, dest, weights + x, 1);
        for (int channel = 1; channel < 3; ++channel) {
            MixRow<std::int8_t, 1>(source + channel, dest + channel, weights + x, 1);
        }
        source += 3;
        dest += 3;
    }
}

using TMixRow = void (*)(const std::uint8_t* source, std::uint8_t* dest,
                         const std::uint8_t* weights, std::int32_t width);

/// Nil for formats whose pixels are no channels that can be mixed.
TMixRow FindMixRow(TZmPixelFormat format) {
    switch (format) {
        case zm8g: return MixRow<std::uint8_t, 1>;
        case zm16g: return MixRow<std::uint16_t, 1>;
        case zm24RGB: return MixRow<std::uint8_t, 3>;
        case zm32f: return MixFloatRow;
        case zmCMYK:
        case zm32RGB: return MixRow<std::uint8_t, 4>;
        case zm48RGB: return MixRow<std::uint16_t, 3>;
        case zmCIELab: return MixLabRow;
        default: return nullptr;
    }
}

void TakeBits(const std::uint8_t* source, std::int32_t source_x, std::uint8_t* dest,
              std::int32_t dest_x, const std::uint8_t* weights, std::int32_t width) {
    for (std::int32_t i = 0; i < width; ++i) {
        if (weights[i] >= kTakeBitFrom) {
            const std::int32_t x = source_x + i;
            const std::int32_t to = dest_x + i;
            const int bit = 0x80 >> (to & 7);
            const bool value = (source[x >> 3] >> (7 - (x & 7)) & 1) != 0;
            dest[to >> 3] =
                static_cast<std::uint8_t>(value ? dest[to >> 3] | bit : dest[to >> 3] & ~bit);
        }
    }
}

TZmRowLayout LayoutOf(TZmBitmap& bitmap) {
    TZmRowLayout layout;
    layout.format = bitmap.GetPixelFormat();
    layout.palette_used = bitmap.GetPaletteUsed();
    if (layout.format == zm8p && bitmap.GetPaletteArray().size() >= 256) {
        layout.palette = bitmap.GetPaletteArray().data();
    }
    layout.context = MakeRowContext(layout.palette);
    return layout;
}

/// Mixes rows of one bitmap into rows of another.
class TRowMixer {
public:
    TRowMixer(TZmBitmap& source, TZmBitmap& dest)
        : source_(LayoutOf(source)),
          dest_(LayoutOf(dest)),
          is_same_format_(source_.format == dest_.format),
          is_same_palette_(is_same_format_ && source_.format == zm8p &&
                           source.GetPaletteArray() == dest.GetPaletteArray()),
          pixel_bytes_(PixelFormatInfo(dest_.format).bit_count / 8) {}

    void Mix(const std::uint8_t* from, std::int32_t from_x, std::uint8_t* to, std::int32_t to_x,
             const std::uint8_t* weights, std::int32_t width) {
        if (is_same_format_ && dest_.format == zm1g) {
            TakeBits(from, from_x, to, to_x, weights, width);
            return;
        }
        const TMixRow mix_row = is_same_format_ ? FindMixRow(dest_.format) : nullptr;
        if (mix_row != nullptr) {
            mix_row(from + std::int64_t{from_x} * pixel_bytes_,
                    to + std::int64_t{to_x} * pixel_bytes_, weights, width);
            return;
        }
        // The way through RGB is not taken where the mask is 0: it would round pixels that stay.
        for (std::int32_t x = 0; x < width;) {
            const std::uint8_t* const end = weights + width;
            const auto first = static_cast<std::int32_t>(
                std::find_if(weights + x, end, [](auto weight) { return weight != 0; }) - weights);
            x = static_cast<std::int32_t>(std::find(weights + first, end, 0) - weights);
            MixAsRGB(from, from_x + first, to, to_x + first, weights + first, x - first);
        }
    }

private:
    void MixAsRGB(const std::uint8_t* from, std::int32_t from_x, std::uint8_t* to,
                  std::int32_t to_x, const std::uint8_t* weights, std::int32_t width) {
        if (width == 0) {
            return;
        }
        sources_.resize(static_cast<std::size_t>(width));
        pixels_.resize(static_cast<std::size_t>(width));
        LoadRGBPixels(from, from_x, width, source_, sources_.data());
        LoadRGBPixels(to, to_x, width, dest_, pixels_.data());
        MixRow<std::uint8_t, 3>(reinterpret_cast<const std::uint8_t*>(sources_.data()),
                                reinterpret_cast<std::uint8_t*>(pixels_.data()), weights, width);
        StoreRGBPixels(pixels_.data(), to, to_x, width, dest_);
        for (std::int32_t i = 0; is_same_palette_ && i < width; ++i) {
            if (weights[i] == 255) {
                to[to_x + i] = from[from_x + i];
            }
        }
    }

    TZmRowLayout source_;
    TZmRowLayout dest_;
    bool is_same_format_;
    bool is_same_palette_;
    std::int32_t pixel_bytes_;
    std::vector<TRGB> sources_;
    std::vector<TRGB> pixels_;
};

/// Values of a mask row from column x on; a set bit counts as 255.
void LoadWeights(const std::uint8_t* row, std::int32_t x, std::int32_t bits_per_pixel,
                 std::vector<std::uint8_t>& weights) {
    if (bits_per_pixel == 8) {
        std::memcpy(weights.data(), row + x, weights.size());
        return;
    }
    for (std::uint8_t& weight : weights) {
        weight = (row[x >> 3] >> (7 - (x & 7)) & 1) != 0 ? 255 : 0;
        ++x;
    }
}

bool IsNothing(const std::vector<std::uint8_t>& weights) {
    return std::all_of(weights.begin(), weights.end(), [](auto weight) { return weight == 0; });
}

}  // namespace

void TZmMask::CopyZmBitmap(TZmBitmap* dest, TZmBitmap* source, std::int32_t left,
                           std::int32_t top) {
    if (dest == nullptr || source == nullptr || dest->IsEmpty() || source->IsEmpty() ||
        dest->GetIsVirtual()) {
        return;
    }
    const auto columns = ClipCopySpan({0, left, source->GetWidth()}, source->GetWidth(),
                                      std::min(fWidth, dest->GetWidth()));
    const auto lines = ClipCopySpan({0, top, source->GetHeight()}, source->GetHeight(),
                                    std::min(fHeight, dest->GetHeight()));
    if (!columns || !lines) {
        return;
    }
    const auto from_x = static_cast<std::int32_t>(columns->source);
    const auto to_x = static_cast<std::int32_t>(columns->dest);
    const auto width = static_cast<std::int32_t>(columns->length);
    TRowMixer mixer(*source, *dest);
    std::vector<std::uint8_t> weights(static_cast<std::size_t>(width));
    for (std::int64_t i = 0; i < lines->length; ++i) {
        const auto y = static_cast<std::int32_t>(lines->dest + i);
        const auto from_y = static_cast<std::int32_t>(lines->source + i);
        const std::uint8_t* const mask_row = GetScanLine(y);
        if (mask_row == nullptr) {
            break;
        }
        LoadWeights(mask_row, to_x, fBitsperpixel, weights);
        if (IsNothing(weights)) {
            continue;
        }
        const std::uint8_t* const from = source->GetRow(from_y);
        std::uint8_t* const to = dest->GetRow(y);
        if (from != nullptr && to != nullptr) {
            mixer.Mix(from, from_x, to, to_x, weights.data(), width);
        }
        dest->FreeRow(y);
        source->FreeRow(from_y);
    }
    dest->SetFull(false);
    dest->Changed();
}

void TZmMask::CopyZmBitmapAlpha(TZmBitmap* dest, TZmBitmap* source, std::int32_t left,
                                std::int32_t top) {
    if (dest != nullptr && source != nullptr && source->HasAlphaChannel()) {
        CopyZmBitmap(dest->GetAlphaChannel(), source->GetAlphaChannelRaw(), left, top);
    }
}

void TZmMask::CopyBitmap(TBitmap* dest, TBitmap* source, std::int32_t left, std::int32_t top) {
    if (dest == nullptr || source == nullptr) {
        return;
    }
    TZmBitmap dest_image;
    TZmBitmap source_image;
    dest_image.EncapsulateTBitmap(dest, /*do_free_image=*/true);
    source_image.EncapsulateTBitmap(source, /*do_free_image=*/true);
    CopyZmBitmap(&dest_image, &source_image, left, top);
    dest->SetModified(true);
}

void TZmMask::CombineWithAlpha(TZmBitmap* SourceAlpha, std::int32_t ox, std::int32_t oy,
                               bool SynchronizeBoundingRect) {
    if (SourceAlpha == nullptr || SourceAlpha->IsEmpty() ||
        (SourceAlpha->GetPixelFormat() != zm8g && SourceAlpha->GetPixelFormat() != zm8p)) {
        return;
    }
    const std::int32_t plane_width = SourceAlpha->GetWidth();
    const std::int32_t plane_height = SourceAlpha->GetHeight();
    const auto columns = ClipCopySpan({0, ox, plane_width}, plane_width, fWidth);
    const auto lines = ClipCopySpan({0, oy, plane_height}, plane_height, fHeight);
    for (std::int64_t i = 0; columns && lines && i < lines->length; ++i) {
        std::uint8_t* const row = GetScanLine(static_cast<std::int32_t>(lines->dest + i));
        const std::uint8_t* const alpha =
            SourceAlpha->GetScanLine(static_cast<std::int32_t>(lines->source + i));
        if (row == nullptr || alpha == nullptr) {
            break;
        }
        for (std::int64_t n = 0; n < columns->length; ++n) {
            const std::int64_t x = columns->dest + n;
            const std::uint8_t value = alpha[columns->source + n];
            if (fBitsperpixel == 8) {
                row[x] = std::min(row[x], value);
            } else if (value == 0) {
                row[x >> 3] = static_cast<std::uint8_t>(row[x >> 3] & ~(0x80 >> (x & 7)));
            }
        }
    }
    if (fFull) {
        SyncFull();
    }
    if (SynchronizeBoundingRect) {
        SyncRect();
    }
}

}  // namespace zm
