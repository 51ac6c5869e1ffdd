/// The conversion matrix between pixel formats. Cells with a row function of their own run row by
/// row; 1-bit output, grey with a display range and quantising have loops here; every other cell
/// changes the source to zm24RGB first.

#include <algorithm>
#include <array>
#include <cstring>

#include "engine/bitmap/zmbitmapmemory_p.h"
#include "engine/bitmap/zmonebit_p.h"
#include "engine/bitmap/zmquantizer.h"
#include "engine/bitmap/zmrgbpixels_p.h"
#include "engine/bitmap/zmrowconvert.h"
#include "engine/bitmap/zmrowconvert_fast_p.h"
#include "engine/bitmap/zmrunmover_p.h"
#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kPaletteEntries = 256;

enum TRoute : std::uint8_t {
    kRouteNone,
    kRouteRows,
    kRouteOneBit,
    kRouteGrayRange,
    kRouteQuantize,
    kRouteVia24,
};

TRoute FindRoute(TZmPixelFormat from, TZmPixelFormat to) {
    constexpr TZmPixelFormatSet kOneBitSources(zm8p, zm8g, zm16g, zm24RGB, zm32f, zm48RGB);
    if (from == to || !IsImageFormat(from) || !IsImageFormat(to)) {
        return kRouteNone;
    }
    if (to == zm1g && kOneBitSources.Contains(from)) {
        return kRouteOneBit;
    }
    if (to == zm24RGB && (from == zm8g || from == zm16g)) {
        return kRouteGrayRange;
    }
    if (from == zm24RGB && to == zm8p) {
        return kRouteQuantize;
    }
    return FindRowFunction(from, to) != nullptr ? kRouteRows : kRouteVia24;
}

/// Rows of a bitmap as 8-bit grey, made in one buffer or, for zm8g, the rows themselves.
class TGrayRows {
public:
    TGrayRows(TZmBitmap& source, const TZmRowContext& context)
        : source_(source),
          context_(context),
          width_(source.GetWidth()),
          convert_(FindRowFunction(source.GetPixelFormat(), zm8g)),
          buffer_(static_cast<std::size_t>(convert_ == nullptr ? 0 : width_)) {}

    const std::uint8_t* GetRow(std::int32_t y) {
        const std::uint8_t* const row = source_.GetScanLine(y);
        if (convert_ == nullptr || row == nullptr) {
            return row;
        }
        convert_(row, buffer_.data(), width_, context_);
        return buffer_.data();
    }

private:
    TZmBitmap& source_;
    TZmRowContext context_;
    std::int32_t width_;
    TZmRowFunction convert_;
    std::vector<std::uint8_t> buffer_;
};

/// Bytes of the greys `first + 0` to `first + count - 1` stretched from black to white.
std::vector<std::uint8_t> MakeRangeTable(std::int32_t count, double black, double white) {
    const double range = white - black;
    const std::int32_t low = std::min(TruncToInt(black), TruncToInt(white));
    const std::int32_t high = std::max(TruncToInt(black), TruncToInt(white));
    std::vector<std::uint8_t> table(static_cast<std::size_t>(count));
    for (std::int32_t value = 0; value < count; ++value) {
        const double limited = std::clamp(value, low, high);
        table[static_cast<std::size_t>(value)] =
            Clamp8(TruncToInt((limited - black) / range * 255.0));
    }
    return table;
}

/// Grey of pixel x in a row of 8 or 16 bits a pixel.
std::size_t GrayAt(const std::uint8_t* row, std::int32_t x, bool is_16_bit) {
    if (!is_16_bit) {
        return row[x];
    }
    std::uint16_t value = 0;
    std::memcpy(&value, row + std::int64_t{x} * 2, sizeof value);
    return value;
}

/// In the order of the wishes of each present format; zmnull ends a row.
constexpr TZmPixelFormat kPreferredFormats[kPixelFormatCount][7] = {
    {zmnull},
    {zm8g, zm16g, zm32f, zm24RGB},
    {zm24RGB, zmCMYK, zm48RGB, zmCIELab},
    {zm16g, zm32f, zm24RGB, zmCMYK, zm48RGB},
    {zm32f, zm8g, zm48RGB, zm24RGB, zmCMYK},
    {zmCMYK, zmCIELab, zm48RGB, zm8p, zm16g, zm8g},
    {zm16g, zm8g, zm24RGB, zm48RGB, zmCIELab},
    {zm24RGB, zm48RGB, zmCIELab, zm8g},
    {zm24RGB, zmCMYK, zmCIELab, zm16g},
    {zm24RGB, zmCMYK, zm48RGB, zm8g},
    {zm24RGB, zmCMYK, zm48RGB, zm8g},
};

TZmPixelFormat FindPreferredFormat(TZmPixelFormat present, const TZmPixelFormatSet& allowed) {
    for (const TZmPixelFormat format : kPreferredFormats[present]) {
        if (format == zmnull) {
            break;
        }
        if (allowed.Contains(format)) {
            return format;
        }
    }
    int ordinal = zm32RGB;
    while (ordinal > zmnull && !allowed.Contains(static_cast<TZmPixelFormat>(ordinal))) {
        --ordinal;
    }
    return static_cast<TZmPixelFormat>(ordinal);
}

/// Converts rows one after the other into a bitmap. Where the target is large and was in use
/// before, they go past the caches, which saves reading the target's lines before they are
/// overwritten: by a function of their own, or moved from a buffer when the source is no larger.
class TRowWriter {
public:
    TRowWriter(TZmBitmap& source, TZmBitmap& dest, bool was_dest_filled)
        : convert_(FindRowFunction(source.GetPixelFormat(), dest.GetPixelFormat())),
          width_(dest.GetWidth()),
          row_bytes_(static_cast<std::size_t>(std::int64_t{width_} * dest.GetBitCount() / 8)),
          mover_(dest, dest.GetRowLen() * dest.GetHeight()) {
        if (!was_dest_filled || !mover_.IsStreaming()) {
            return;
        }
        const TZmRowFunction stream =
            FindStreamingRowFunction(source.GetPixelFormat(), dest.GetPixelFormat());
        if (stream != nullptr) {
            convert_ = stream;  // the mover ends what it leaves under way
        } else if (source.GetBitCount() <= dest.GetBitCount()) {
            buffer_.resize(row_bytes_);
        }
    }

    void Write(const std::uint8_t* from, std::uint8_t* to, const TZmRowContext& context) {
        if (buffer_.empty()) {
            convert_(from, to, width_, context);
        } else {
            convert_(from, buffer_.data(), width_, context);
            mover_.Move(to, buffer_.data(), row_bytes_);
        }
    }

private:
    TZmRowFunction convert_;
    std::int32_t width_;
    std::size_t row_bytes_;
    TRunMover mover_;
    std::vector<std::uint8_t> buffer_;
};

template <typename Channel>
bool IsGrayRow(const std::uint8_t* row, std::int32_t width, std::size_t channel_count) {
    for (std::int32_t x = 0; x < width; ++x, row += channel_count * sizeof(Channel)) {
        if (std::memcmp(row, row + sizeof(Channel), 2 * sizeof(Channel)) != 0) {
            return false;
        }
    }
    return true;
}

}  // namespace

// Cells of the matrix.

void TZmBitmap::ConvertRowsFrom(TZmBitmap& source) {
    const TZmRowContext context = source.GetRowLayout().context;
    if (fPixelFormat == zm8p && source.fPixelFormat == zm1g) {
        fRGBPalette.assign(kPaletteEntries, TRGB{});
        fRGBPalette[1] = TRGB{255, 255, 255};
    } else if (fPixelFormat == zm8p) {
        SetGrayPalette();
    }
    const bool was_filled =
        fEncapsulatedFromMemory || WasBlockFilled(fRealMemory, fRealMemoryAllocator);
    TRowWriter writer(source, *this, was_filled);
    const bool is_upward = IsStoredBottomUp(*this) && !source.fIsVirtual;
    for (std::int32_t i = 0; i < fHeight; ++i) {
        const std::int32_t y = is_upward ? fHeight - 1 - i : i;
        const std::uint8_t* const from = source.GetScanLine(y);
        std::uint8_t* const to = GetScanLine(y);
        if (from != nullptr && to != nullptr) {
            writer.Write(from, to, context);
        }
    }
    if (!fEncapsulatedFromMemory) {
        NoteBlockFilled(fRealMemory, fRealMemoryAllocator);
    }
}

void TZmBitmap::ConvertToOneBitFrom(TZmBitmap& source) {
    // Required: the third method, error diffusion, is not part of this conversion; the bits stay
    // as they were allocated.
    if (fDefaultDitherMethod != zmOrdered && fDefaultDitherMethod != zmThreshold) {
        return;
    }
    const bool is_ordered = fDefaultDitherMethod == zmOrdered;
    const bool is_ordered_float = is_ordered && source.fPixelFormat == zm32f;
    TGrayRows rows(source, source.GetRowLayout().context);
    std::int32_t level = 0;
    if (!is_ordered) {
        TGrayHistogram histogram{};
        for (std::int32_t y = 0; y < fHeight; ++y) {
            if (const std::uint8_t* const gray = rows.GetRow(y)) {
                AddToHistogram(gray, fWidth, histogram);
            }
        }
        level = FindAutomaticLevel(histogram);
    }
    for (std::int32_t y = 0; y < fHeight; ++y) {
        const std::uint8_t* const from = is_ordered_float ? source.GetScanLine(y) : rows.GetRow(y);
        std::uint8_t* const to = GetScanLine(y);
        if (from == nullptr || to == nullptr) {
            continue;
        }
        if (is_ordered_float) {
            OrderedBitsFromFloat(from, to, fWidth, y);
        } else if (is_ordered) {
            OrderedBitsFromGray(from, to, fWidth, y);
        } else {
            ThresholdBits(from, to, fWidth, level);
        }
    }
}

/// Grey to zm24RGB. With a display range the greys between black and white are stretched over
/// all bytes; the range is used up by that.
void TZmBitmap::ConvertGrayRangeFrom(TZmBitmap& source) {
    if (fWhiteValue - fBlackValue == 0) {
        ConvertRowsFrom(source);
    } else {
        const bool is_16_bit = source.fPixelFormat == zm16g;
        const std::vector<std::uint8_t> table =
            MakeRangeTable(is_16_bit ? 65536 : 256, fBlackValue, fWhiteValue);
        for (std::int32_t y = 0; y < fHeight; ++y) {
            const std::uint8_t* const from = source.GetScanLine(y);
            std::uint8_t* to = GetScanLine(y);
            if (from == nullptr || to == nullptr) {
                continue;
            }
            for (std::int32_t x = 0; x < fWidth; ++x, to += 3) {
                std::memset(to, table[GrayAt(from, x, is_16_bit)], 3);
            }
        }
    }
    fBlackValue = 0;
    fWhiteValue = 0;
}

void TZmBitmap::QuantizeFrom(TZmBitmap& source) {
    std::vector<TRGB> palette;
    TZmQuantizer quantizer(source, palette, std::clamp(fPaletteUsed, 1, kPaletteEntries));
    palette.resize(kPaletteEntries);
    fRGBPalette = palette;
    std::vector<std::uint16_t> indexes(static_cast<std::size_t>(fWidth));
    for (std::int32_t y = 0; y < fHeight; ++y) {
        const auto* const from = reinterpret_cast<const TRGB*>(source.GetScanLine(y));
        std::uint8_t* const to = GetScanLine(y);
        if (from == nullptr || to == nullptr) {
            continue;
        }
        quantizer.GetRGBIndexes(from, indexes.size(), indexes.data());
        // A palette of the source's own has no index for other colours.
        std::transform(indexes.begin(), indexes.end(), to, [](std::uint16_t index) {
            return static_cast<std::uint8_t>(std::min<std::int32_t>(index, kPaletteEntries - 1));
        });
    }
}

/// Fills the pixels of this allocated bitmap; the formats differ and the sizes agree. False when
/// a step between found no room: the pixels are then undefined.
bool TZmBitmap::ConvertPixelsFrom(TZmBitmap& source) {
    if (fIsVirtual || IsEmpty() || source.IsEmpty()) {
        return true;
    }
    const bool is_threshold_of_48 = source.fPixelFormat == zm48RGB && fPixelFormat == zm1g &&
                                    fDefaultDitherMethod == zmThreshold;
    if (FindRoute(source.fPixelFormat, fPixelFormat) == kRouteVia24 || is_threshold_of_48) {
        if (source.fIsVirtual) {  // whose rows would stay in the old format
            TZmBitmap rendered;
            rendered.AssignEx(&source, /*with_params=*/false);
            return ConvertPixelsFrom(rendered);
        }
        if (!source.SetPixelFormat(zm24RGB)) {
            return false;
        }
    }
    switch (FindRoute(source.fPixelFormat, fPixelFormat)) {
        case kRouteRows: ConvertRowsFrom(source); break;
        case kRouteOneBit: ConvertToOneBitFrom(source); break;
        case kRouteGrayRange: ConvertGrayRangeFrom(source); break;
        case kRouteQuantize: QuantizeFrom(source); break;
        default: break;
    }
    UpdateTBitmapPalette();
    return true;
}

void TZmBitmap::CopyAndConvertFormat(TZmBitmap* source) {
    if (source == nullptr || source == this || source->GetWidth() != GetWidth() ||
        source->fHeight != fHeight) {
        return;
    }
    if (source->fPixelFormat != fPixelFormat) {
        ConvertPixelsFrom(*source);
    }
    if (source->HasAlphaChannel()) {
        AssignAlphaFrom(*source);
    }
    UpdateTBitmapPalette();
}

// The pixel format as a property.

bool TZmBitmap::SetPixelFormat(TZmPixelFormat format) {
    if (format == GetPixelFormat()) {
        return true;
    }
    if (fIsVirtual || fWidth < 1 || fHeight < 1) {
        fPixelFormat = IsImageFormat(format) ? format : zmnull;
        DeriveFields();
        return true;
    }
    if (!IsImageFormat(format)) {
        return false;
    }
    if (IsEmpty()) {
        return AllocateFirstPixels(format);
    }
    if (fLocation == zmTBitmap) {
        return ConvertTBitmapFormat(format);
    }
    TZmBitmap old;
    old.fMinFileSize = fMinFileSize;
    old.fMemoryAllocator = fMemoryAllocator;
    old.MovePixelsFrom(*this);
    bool is_converted = false;
    try {
        is_converted =
            AllocateNewStorage(old.fWidth, old.fHeight, format) && ConvertPixelsFrom(old);
    } catch (...) {  // a row on disk that cannot be mapped, or no memory for a row
        FreePixels();
        MovePixelsFrom(old);
        throw;
    }
    if (!is_converted) {
        FreePixels();
        MovePixelsFrom(old);
        return false;
    }
    Changed();
    return true;
}

/// Makes room for a bitmap that was given its sides before its format. Without room the sides
/// stay, and the format is none.
bool TZmBitmap::AllocateFirstPixels(TZmPixelFormat format) {
    const std::int32_t width = fWidth;
    const std::int32_t height = fHeight;
    const bool is_allocated = AllocateNewStorage(width, height, format);
    if (is_allocated) {
        Changed();
    } else {
        fWidth = width;
        fHeight = height;
        fPixelFormat = zmnull;
        DeriveFields();
    }
    return is_allocated;
}

/// Converts within what a platform bitmap can hold; other formats are refused.
bool TZmBitmap::ConvertTBitmapFormat(TZmPixelFormat format) {
    constexpr TZmPixelFormatSet kHeld(zm1g, zm8p, zm8g, zm16g, zm24RGB, zm32RGB);
    if (!kHeld.Contains(format)) {
        return false;
    }
    const TZmPixelFormat held_format = format == zm16g ? zm8g : format;
    if (held_format == fPixelFormat) {
        return true;
    }
    TZmBitmap converted;
    converted.AssignEx(this, /*with_params=*/false);
    converted.RemoveAlphaChannel(/*merge=*/false, 0);
    if (converted.IsEmpty() || !converted.SetPixelFormat(held_format) ||
        !ReplaceTBitmapPixels(converted)) {
        return false;
    }
    Changed();
    return true;
}

bool TZmBitmap::CheckFormat(const TZmPixelFormatSet& allowed, bool auto_convert) {
    const TZmPixelFormat present = GetPixelFormat();
    if (allowed.IsEmpty() || allowed.Contains(present)) {
        return true;
    }
    return auto_convert && SetPixelFormat(FindPreferredFormat(present, allowed));
}

bool TZmBitmap::IsGrayScale() {
    constexpr TZmPixelFormatSet kGrayFormats(zm1g, zm8g, zm16g, zm32f);
    constexpr TZmPixelFormatSet kColorFormats(zm24RGB, zm32RGB, zm48RGB);
    const TZmPixelFormat format = GetPixelFormat();
    if (format == zm8p) {
        const auto used = std::min(fRGBPalette.size(), static_cast<std::size_t>(fPaletteUsed));
        return std::all_of(fRGBPalette.begin(), fRGBPalette.begin() + std::ptrdiff_t(used),
                           [](TRGB rgb) { return rgb.r == rgb.g && rgb.g == rgb.b; });
    }
    if (!kColorFormats.Contains(format)) {
        return kGrayFormats.Contains(format);
    }
    for (std::int32_t y = 0; y < fHeight && !IsEmpty(); ++y) {
        const std::uint8_t* const row = GetScanLine(y);
        if (row == nullptr) {
            return false;
        }
        const bool is_gray = format == zm48RGB
                                 ? IsGrayRow<std::uint16_t>(row, fWidth, 3)
                                 : IsGrayRow<std::uint8_t>(row, fWidth, format == zm24RGB ? 3 : 4);
        if (!is_gray) {
            return false;
        }
    }
    return true;
}

}  // namespace zm
