// Conversions of the processor to few colours and to other pixel formats.

#include <algorithm>
#include <memory>
#include <string>
#include <utility>

#include "engine/bitmap/zmquantizer.h"
#include "engine/bitmap/zmrgbrows.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstrings.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmdither.h"
#include "engine/proc/zmpalettes.h"
#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

constexpr std::int32_t kMinColors = 3;
constexpr std::int32_t kMaxColors = 1024;
constexpr std::int32_t kPaletteEntries = 256;

TZmDitherType DitherTypeOf(TZmDitherMethod method) {
    switch (method) {
        case zmOrdered: return zmdtOrdered8x8;
        case zmDithering: return zmdtErrorDiffusion;
        default: return zmdtSolid;
    }
}

std::u16string ColorCountCaption(std::int32_t count) {
    std::u16string caption = OperationCaption(kOperationConvertColors);
    const std::size_t place = caption.find(u"%d");
    if (place != std::u16string::npos) {
        caption.replace(place, 2, Utf16FromUtf8(std::to_string(count)));
    }
    return caption;
}

/// A palette with the way to find entries of it.
class TColorChoice {
public:
    /// The colours of a fixed palette.
    explicit TColorChoice(TZmPalette palette)
        : palette_(std::move(palette)),
          finder_(std::make_unique<TPaletteFinder>(palette_.colors)) {}
    /// The best `count` colours for an image.
    TColorChoice(TZmBitmap& image, std::int32_t count)
        : quantizer_(std::make_unique<TZmQuantizer>(image, palette_.colors, count)) {
        palette_.steps = EstimateSteps(palette_.colors.size());
        if (quantizer_->GetGrayScale()) {
            const auto step = static_cast<std::int32_t>(256 / palette_.colors.size());
            palette_.steps = {step, step, step};
        }
    }

    const TZmPalette& Palette() const { return palette_; }
    std::int32_t Used() const {
        return quantizer_ != nullptr ? quantizer_->GetFoundColors()
                                     : static_cast<std::int32_t>(palette_.colors.size());
    }
    /// Always an entry of the palette: an image of its own palette has no index for other colours.
    std::int32_t Find(TRGB color) {
        const auto count = static_cast<std::int32_t>(palette_.colors.size());
        const std::int32_t index =
            quantizer_ != nullptr ? quantizer_->GetRGBIndex(color) : finder_->Find(color);
        if (index >= 0 && index < count) {
            return index;
        }
        if (finder_ == nullptr) {
            finder_ = std::make_unique<TPaletteFinder>(palette_.colors);
        }
        return finder_->Find(color);
    }
    /// Find of a row of colours.
    void FindRow(const TRGB* row, std::vector<std::uint16_t>& indexes) {
        if (quantizer_ == nullptr) {
            std::transform(row, row + indexes.size(), indexes.begin(), [this](TRGB color) {
                return static_cast<std::uint16_t>(finder_->Find(color));
            });
            return;
        }
        quantizer_->GetRGBIndexes(row, indexes.size(), indexes.data());
        for (std::size_t x = 0; x < indexes.size(); ++x) {
            if (indexes[x] >= palette_.colors.size()) {
                indexes[x] = static_cast<std::uint16_t>(Find(row[x]));
            }
        }
    }

private:
    TZmPalette palette_;
    std::unique_ptr<TZmQuantizer> quantizer_;
    std::unique_ptr<TPaletteFinder> finder_;
};

/// Rows done, as the listener wants them.
void ReportRow(const TResampleListener& listener, std::int32_t y, std::int32_t height) {
    if (listener.on_progress) {
        listener.on_progress(listener.sender, TruncToInt((y + 1.0) * (100.0 / height)));
    }
}

void WriteIndexes(const std::vector<std::uint16_t>& indexes, std::uint8_t* out) {
    for (const std::uint16_t index : indexes) {
        *out++ = static_cast<std::uint8_t>(index);
    }
}

void WriteColors(const std::vector<std::uint16_t>& indexes, const std::vector<TRGB>& colors,
                 std::uint8_t* out) {
    for (const std::uint16_t index : indexes) {
        const TRGB color = colors[index];
        *out++ = color.b;
        *out++ = color.g;
        *out++ = color.r;
    }
}

/// Writes the colours of `source` to another bitmap of the same size, zm8p or zm24RGB.
void MapPixels(TZmBitmap& source, TZmBitmap& target, TColorChoice& choice, TZmDitherType dither,
               const TResampleListener& listener) {
    const std::int32_t height = source.GetHeight();
    const bool has_palette = target.GetPixelFormat() == zm8p;
    TZmRgbRows rows(source);
    TDitherer ditherer(
        choice.Palette(), [&](TRGB color) { return choice.Find(color); }, dither,
        source.GetWidth());
    std::vector<std::uint16_t> indexes(static_cast<std::size_t>(source.GetWidth()));
    for (std::int32_t y = 0; y < height; ++y) {
        const TRGB* const row = rows.GetRow(y);
        if (row == nullptr) {
            continue;
        }
        if (dither == zmdtSolid) {
            choice.FindRow(row, indexes);
        } else {
            ditherer.MapRow(row, indexes.data());
        }
        std::uint8_t* const out = target.GetScanLine(y);
        if (has_palette) {
            WriteIndexes(indexes, out);
        } else {
            WriteColors(indexes, choice.Palette().colors, out);
        }
        ReportRow(listener, y, height);
    }
}

/// Puts a converted image in the place of the old one, whose plane it takes over.
void ReplacePixels(TZmBitmap& image, TZmBitmap& converted) {
    if (image.HasAlphaChannel()) {
        converted.ReplaceAlphaChannel(image.DetachAlphaChannel(/*create_if_not_exists=*/false));
    }
    image.TakeOver(converted);
}

bool ConvertToIndexes(TZmBitmap& image, TColorChoice& choice, TZmDitherType dither,
                      const TResampleListener& listener) {
    TZmBitmap converted;
    TakePlaceSettings(image, converted);
    if (!converted.Allocate(image.GetWidth(), image.GetHeight(), zm8p)) {
        return false;
    }
    const std::vector<TRGB>& colors = choice.Palette().colors;
    for (std::size_t i = 0; i < colors.size(); ++i) {
        converted.SetPalette(static_cast<std::int32_t>(i), colors[i]);
    }
    converted.SetPaletteUsed(choice.Used());
    MapPixels(image, converted, choice, dither, listener);
    ReplacePixels(image, converted);
    return true;
}

bool ConvertToBits(TZmBitmap& image, TZmDitherType dither, const TResampleListener& listener) {
    TZmBitmap converted;
    TakePlaceSettings(image, converted);
    const std::int32_t width = image.GetWidth();
    if (!converted.Allocate(width, image.GetHeight(), zm1g)) {
        return false;
    }
    const TZmRowContext context = MakeRowContext(nullptr);
    TZmRgbRows rows(image);
    TBitDitherer ditherer(dither, width);
    std::vector<std::uint8_t> grays(static_cast<std::size_t>(width));
    for (std::int32_t y = 0; y < image.GetHeight(); ++y) {
        const TRGB* const row = rows.GetRow(y);
        for (std::int32_t x = 0; row != nullptr && x < width; ++x) {
            grays[static_cast<std::size_t>(x)] = GrayByCoef(row[x], context);
        }
        ditherer.MapRow(grays.data(), converted.GetScanLine(y));
        ReportRow(listener, y, image.GetHeight());
    }
    ReplacePixels(image, converted);
    return true;
}

/// The two ways that the conversion matrix has of its own.
bool ConvertByMatrix(TZmBitmap& image, TZmDitherMethod method) {
    const TZmDitherMethod kept = image.GetDefaultDitherMethod();
    image.SetDefaultDitherMethod(method);
    const bool is_done = image.SetPixelFormat(zm1g);
    image.SetDefaultDitherMethod(kept);
    return is_done;
}

bool ConvertToOneBit(TZmBitmap& image, TZmDitherType dither, const TResampleListener& listener) {
    if (image.GetPixelFormat() == zm1g) {
        return true;
    }
    if (dither == zmdtSolid) {
        return ConvertByMatrix(image, zmThreshold);
    }
    if (dither == zmdtOrdered8x8) {
        return ConvertByMatrix(image, zmOrdered);
    }
    return ConvertToBits(image, dither, listener);
}

bool ConvertToPaletteType(TZmBitmap& image, TZmPaletteType palette_type, TZmDitherType dither,
                          const TResampleListener& listener) {
    if (palette_type != zmptMedianCut) {
        TColorChoice choice(MakeFixedPalette(palette_type));
        return ConvertToIndexes(image, choice, dither, listener);
    }
    if (image.GetPixelFormat() == zm8p) {
        return true;
    }
    TColorChoice choice(image, kPaletteEntries);
    return ConvertToIndexes(image, choice, dither, listener);
}

bool CanConvert(TZmBitmap& image, TZmPixelFormat format, TZmPaletteType palette_type,
                TZmDitherType dither) {
    constexpr TZmPixelFormatSet kHeldByTBitmap(zm1g, zm8p, zm8g, zm24RGB, zm32RGB);
    if (image.IsEmpty() || image.GetIsVirtual() || !IsImageFormat(format) ||
        palette_type >= kPaletteTypeCount || dither >= kDitherTypeCount ||
        (image.GetLocation() == zmTBitmap && !kHeldByTBitmap.Contains(format))) {
        return false;
    }
    return format != zm1g || palette_type == zmptFixedBW;
}

}  // namespace

void TZalmoProc::ConvertTo(std::int32_t num_colors, TZmDitherMethod dither_method) {
    if (num_colors < kMinColors || num_colors > kMaxColors) {
        return;
    }
    ReduceColors(ColorCountCaption(num_colors), kOperationConvertColors, [&](TZmBitmap& image) {
        // Into another bitmap, so that a listener who stops the work leaves the image whole.
        TZmBitmap mapped;
        TakePlaceSettings(image, mapped);
        if (!mapped.Allocate(image.GetWidth(), image.GetHeight(), zm24RGB)) {
            return;
        }
        TColorChoice choice(image, num_colors);
        MapPixels(image, mapped, choice, DitherTypeOf(dither_method), {this, fOnProgress});
        ReplacePixels(image, mapped);
    });
}

void TZalmoProc::ConvertToPalette(const std::vector<TRGB>& colors, TZmDitherMethod dither_method) {
    if (colors.empty() || colors.size() > kPaletteEntries) {
        return;
    }
    ReduceColors(
        OperationCaption(kOperationConvertToPalette), kOperationConvertToPalette,
        [&](TZmBitmap& image) {
            TColorChoice choice(TZmPalette{colors, EstimateSteps(colors.size())});
            ConvertToIndexes(image, choice, DitherTypeOf(dither_method), {this, fOnProgress});
        });
}

/// The frame of the two reductions: `reduce` gets a zm24RGB image with pixels.
void TZalmoProc::ReduceColors(const std::u16string& caption, std::int32_t operation,
                              const std::function<void(TZmBitmap& image)>& reduce) {
    RequireBitmap();
    if (fZmBitmap->IsEmpty() || fZmBitmap->GetIsVirtual()) {
        return;
    }
    TZmBitmap* image = nullptr;
    std::int32_t x1 = 0;
    std::int32_t y1 = 0;
    std::int32_t x2 = 0;
    std::int32_t y2 = 0;
    if (!BeginImageProcessing(TZmPixelFormatSet(zm24RGB), x1, y1, x2, y2, caption, image,
                              operation)) {
        return;
    }
    reduce(*image);
    EndImageProcessing(image);
    if (fOnFinishWork) {
        fOnFinishWork(this);
    }
}

bool TZalmoProc::ConvertTo(TZmPixelFormat format, TZmPaletteType palette_type,
                           TZmDitherType dither_type, bool check_parameters_only) {
    if (!MakeConsistent(TZmPixelFormatSet(), /*check_view=*/false) ||
        !CanConvert(*fZmBitmap, format, palette_type, dither_type)) {
        return false;
    }
    if (check_parameters_only) {
        return true;
    }
    if (fAutoUndo) {
        SaveUndo(OperationCaption(kOperationConvertPixels), zmuImage, /*clear_redo=*/true,
                 kOperationConvertPixels);
    }
    const TResampleListener listener{this, fOnProgress};
    bool is_done = false;
    if (format == zm8p) {
        is_done = ConvertToPaletteType(*fZmBitmap, palette_type, dither_type, listener);
    } else if (format == zm1g) {
        is_done = ConvertToOneBit(*fZmBitmap, dither_type, listener);
    } else {
        is_done = fZmBitmap->SetPixelFormat(format);
    }
    Update();
    if (fOnFinishWork) {
        fOnFinishWork(this);
    }
    return is_done;
}

}  // namespace zm
