/// The renderer's entries: clipping, the choice between the direct and the scaled path, and the
/// direct path with its tables.

#include <algorithm>
#include <cmath>

#include "engine/bitmap/zmrender_p.h"
#include "engine/bitmap/zmrunmover_p.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int32_t kRatioOne = 16384;                // one to one, 14 fractional bits
constexpr double kLargestShift = 1152921504606846976.0;  // 2^60: sums of a few stay in 64 bits

std::int64_t TruncShift(double value) {
    return static_cast<std::int64_t>(std::clamp(value, -kLargestShift, kLargestShift));
}

std::int64_t RoundShift(double value) {
    return TruncShift(std::nearbyint(value));
}

/// One axis of a drawing while it is clipped; wide enough for every sum of arguments.
struct TClipAxis {
    std::int64_t dest = 0;
    std::int64_t dest_size = 0;
    std::int64_t source = 0;
    std::int64_t source_size = 0;
    double ratio = 1;

    void ClipToDestination(std::int32_t limit) {
        if (dest < 0) {
            const std::int64_t shift = RoundShift(static_cast<double>(-dest) * ratio);
            dest_size += dest;
            dest = 0;
            source += shift;
            source_size -= shift;
        }
        if (const std::int64_t over = dest + dest_size - limit; over > 0) {
            dest_size -= over;
            source_size -= TruncShift(static_cast<double>(over) * ratio);
        }
    }

    void ClipToSource(std::int32_t limit) {
        if (source < 0) {
            const std::int64_t shift = RoundShift(static_cast<double>(-source) / ratio);
            source_size += source;
            source = 0;
            dest += shift;
            dest_size -= shift;
        }
        if (const std::int64_t over = source + source_size - limit; over > 0) {
            source_size -= over;
            dest_size -= TruncShift(static_cast<double>(over) / ratio);
        }
    }

    /// False when no pixel is left.
    bool Limit(std::int32_t dest_limit, std::int32_t source_limit) {
        source = std::clamp<std::int64_t>(source, 0, source_limit - 1);
        source_size = std::clamp<std::int64_t>(source_size, 0, source_limit);
        dest = std::clamp<std::int64_t>(dest, 0, dest_limit - 1);
        dest_size = std::clamp<std::int64_t>(dest_size, 0, dest_limit);
        return dest_size > 0 && source_size > 0;
    }

    bool Clip(std::int32_t dest_limit, std::int32_t source_limit) {
        ClipToDestination(dest_limit);
        ClipToSource(source_limit);
        return Limit(dest_limit, source_limit);
    }
};

/// Entry i is the source pixel of destination pixel `dest` + i.
TZmLookupTable MakeTable(std::int32_t dest_size, std::int32_t source, double ratio,
                         std::int32_t source_limit) {
    TZmLookupTable table(static_cast<std::size_t>(dest_size));
    for (std::int32_t i = 0; i < dest_size; ++i) {
        const std::int32_t position = TruncToInt(i * ratio + source);
        table[static_cast<std::size_t>(i)] = std::clamp(position, 0, source_limit - 1);
    }
    return table;
}

/// Brings a caller's table into a state in which it can be used without tests.
void PrepareTable(TZmLookupTable& table, std::int32_t dest_size, std::int32_t source, double ratio,
                  std::int32_t source_limit) {
    if (table.size() < static_cast<std::size_t>(dest_size)) {
        table = MakeTable(dest_size, source, ratio, source_limit);
    }
    for (std::int32_t& entry : table) {
        entry = std::clamp(entry, 0, source_limit - 1);
    }
}

std::int32_t FixedRatio(std::int32_t source_size, std::int32_t dest_size) {
    return TruncToInt(static_cast<double>(source_size) / dest_size * kRatioOne);
}

/// Whether three bytes a pixel can be written to the rows of a bitmap.
bool HasColorRows(TZmBitmap& bitmap) {
    return !bitmap.IsEmpty() && !bitmap.GetIsVirtual() &&
           bitmap.GetRowLen() / 3 >= bitmap.GetWidth();
}

/// Rows that lie one to one: an image into itself from the top, others as they lie in memory.
void CopyRows(TZmBitmap& source, const TZmRenderCall& call, const TRect& area) {
    const auto bytes = static_cast<std::size_t>(area.right - area.left) * sizeof(TRGB);
    const std::int64_t source_x = std::int64_t{call.source.x} + area.left - call.dest.x;
    const std::int32_t height = area.bottom - area.top;
    const TRunMover mover(*call.destination, static_cast<std::int64_t>(bytes) * height);
    const bool is_upward = &source != call.destination && IsStoredBottomUp(*call.destination);
    for (std::int32_t i = 0; i < height; ++i) {
        const std::int32_t y = is_upward ? area.bottom - 1 - i : area.top + i;
        const TRowHold from(source, call.source.y + (y - call.dest.y));
        const TRowHold to(*call.destination, y);
        if (from.Get() != nullptr && to.Get() != nullptr) {
            mover.Move(to.Get() + std::int64_t{area.left} * 3, from.Get() + source_x * 3, bytes);
        }
    }
}

void ReleaseTable(TZmLookupTable* table) {
    if (table != nullptr) {
        *table = TZmLookupTable();
    }
}

std::int32_t SideOf(std::int32_t first, std::int32_t last) {
    return SaturateToInt32(std::int64_t{last} - first);
}

}  // namespace

bool ClipRenderCall(TZmRenderCall& call, std::int32_t source_width, std::int32_t source_height) {
    TClipAxis x{call.dest.x, call.dest.width, call.source.x, call.source.width, call.ratio_x};
    TClipAxis y{call.dest.y, call.dest.height, call.source.y, call.source.height, call.ratio_y};
    const bool has_columns = x.Clip(call.destination->GetWidth(), source_width);
    const bool has_rows = y.Clip(call.destination->GetHeight(), source_height);
    call.dest = TZmRenderRect{SaturateToInt32(x.dest), SaturateToInt32(y.dest),
                              SaturateToInt32(x.dest_size), SaturateToInt32(y.dest_size)};
    call.source = TZmRenderRect{SaturateToInt32(x.source), SaturateToInt32(y.source),
                                SaturateToInt32(x.source_size), SaturateToInt32(y.source_size)};
    return has_columns && has_rows;
}

TRect FindVisibleRect(const TZmRenderCall& call) {
    const std::int64_t right = std::int64_t{call.dest.x} + call.dest.width;
    const std::int64_t bottom = std::int64_t{call.dest.y} + call.dest.height;
    TRect rect{
        call.dest.x, call.dest.y,
        static_cast<std::int32_t>(std::min<std::int64_t>(right, call.destination->GetWidth())),
        static_cast<std::int32_t>(std::min<std::int64_t>(bottom, call.destination->GetHeight()))};
    if (const TRect* const update = call.update_rect; update != nullptr) {
        rect.left = std::max(rect.left, update->left);
        rect.top = std::max(rect.top, update->top);
        rect.right = std::min(rect.right, update->right);
        rect.bottom = std::min(rect.bottom, update->bottom);
    }
    return rect;
}

TZmBitmap* FindRenderPlane(TZmBitmapRendering& source, bool enable_alpha) {
    TZmBitmap* const plane = enable_alpha ? source.GetAlphaChannelRaw() : nullptr;
    const bool is_usable = plane != nullptr && plane->GetPixelFormat() == zm8g && !plane->IsEmpty();
    return is_usable ? plane : nullptr;
}

// The display settings.

std::int32_t TZmBitmapRendering::GetChannelOffset(std::size_t channel) const {
    return channel < fChannelOffset.size() ? fChannelOffset[channel] : 0;
}

void TZmBitmapRendering::SetChannelOffset(std::size_t channel, std::int32_t value) {
    if (channel < fChannelOffset.size()) {
        fChannelOffset[channel] = value;
    }
}

void TZmBitmapRendering::CopyDisplaySettingsFrom(const TZmBitmapRendering& source) {
    fBlackValue = source.fBlackValue;
    fWhiteValue = source.fWhiteValue;
    fChannelOffset = source.fChannelOffset;
    fEnableChannelOffset = source.fEnableChannelOffset;
    fContrast = source.fContrast;
}

// The paths.

TZmBitmap& TZmBitmapRendering::Self() {
    return static_cast<TZmBitmap&>(*this);
}

void TZmBitmapRendering::Render(TZmRenderCall call) {
    const bool has_sizes = call.dest.width > 0 && call.dest.height > 0 && call.source.width > 0 &&
                           call.source.height > 0;
    if (!has_sizes || call.destination == nullptr || Self().IsEmpty() ||
        !HasColorRows(*call.destination)) {
        return;
    }
    call.ratio_x = static_cast<double>(call.source.width) / call.dest.width;
    call.ratio_y = static_cast<double>(call.source.height) / call.dest.height;
    call.transparency = std::clamp(call.transparency, 0, 255);
    call.opacity = call.opacity > 0 ? std::min(call.opacity, 1.0) : 0.0;
    if (!ClipRenderCall(call, GetWidth(), GetHeight())) {
        return;
    }
    const bool is_scaled =
        call.dest.width != call.source.width || call.dest.height != call.source.height;
    if (call.filter != rfNone && is_scaled) {
        RenderScaled(call);
    } else {
        RenderDirect(call);
    }
}

bool TZmBitmapRendering::IsPlainCopy(const TZmRenderCall& call, bool is_blending) {
    return FixedRatio(call.source.width, call.dest.width) == kRatioOne &&
           FixedRatio(call.source.height, call.dest.height) == kRatioOne &&
           GetPixelFormat() == zm24RGB && !Self().GetIsVirtual() && !is_blending &&
           !fEnableChannelOffset && fContrast == 0 && call.operation == zmlNormal &&
           fBlackValue == 0 && fWhiteValue == 0;
}

void TZmBitmapRendering::RenderDirect(const TZmRenderCall& call) {
    TZmBitmap* const plane = FindRenderPlane(*this, call.enable_alpha);
    const bool is_reduced = call.transparency < 255 || call.opacity < 1.0;
    const bool is_blending = is_reduced || (plane != nullptr && !plane->GetFull());
    const TRect area = FindVisibleRect(call);
    const bool is_visible = area.left < area.right && area.top < area.bottom;
    if (IsPlainCopy(call, is_blending)) {
        if (is_visible) {
            CopyRows(Self(), call, area);
        }
    } else {
        const std::vector<std::uint8_t> row_alpha(
            static_cast<std::size_t>(is_reduced ? GetWidth() : 0),
            static_cast<std::uint8_t>(TruncToInt(call.transparency * call.opacity)));
        TZmLookupTable own_columns;
        TZmLookupTable own_rows;
        TZmLookupTable& columns = call.columns != nullptr ? *call.columns : own_columns;
        TZmLookupTable& rows = call.rows != nullptr ? *call.rows : own_rows;
        PrepareTable(columns, call.dest.width, call.source.x, call.ratio_x, GetWidth());
        PrepareTable(rows, call.dest.height, call.source.y, call.ratio_y, GetHeight());
        if (is_visible) {
            TZmRenderTransfer transfer{call.destination, area};
            transfer.columns = columns.data() + (area.left - call.dest.x);
            transfer.rows = rows.data() + (area.top - call.dest.y);
            transfer.plane = plane;
            transfer.row_alpha = row_alpha.data();
            transfer.solid_background = call.solid_background;
            transfer.transparency = call.transparency;
            transfer.operation = call.operation;
            transfer.opacity = call.opacity;
            TransferPixels(transfer, is_blending);
        }
    }
    call.destination->Changed();
}

// The entries.

void TZmBitmapRendering::RenderToTZmBitmap(TZmBitmap* ABitmap, TZmLookupTable* XLUT,
                                           TZmLookupTable* YLUT, const TRect* UpdRect,
                                           std::int32_t xDst, std::int32_t yDst, std::int32_t dxDst,
                                           std::int32_t dyDst, std::int32_t xSrc, std::int32_t ySrc,
                                           std::int32_t dxSrc, std::int32_t dySrc, bool EnableAlpha,
                                           bool SolidBackground, std::int32_t Transparency,
                                           TResampleFilter Filter, bool FreeTables,
                                           TZmRenderOperation RenderOperation, double Opacity) {
    TZmRenderCall call;
    call.destination = ABitmap;
    call.columns = XLUT;
    call.rows = YLUT;
    call.update_rect = UpdRect;
    call.dest = TZmRenderRect{xDst, yDst, dxDst, dyDst};
    call.source = TZmRenderRect{xSrc, ySrc, dxSrc, dySrc};
    call.enable_alpha = EnableAlpha;
    call.solid_background = SolidBackground;
    call.transparency = Transparency;
    call.filter = Filter;
    call.operation = RenderOperation;
    call.opacity = Opacity;
    Render(call);
    if (FreeTables) {
        ReleaseTable(XLUT);
        ReleaseTable(YLUT);
    }
}

void TZmBitmapRendering::RenderToTZmBitmapEx(TZmBitmap* Dest, std::int32_t xDst, std::int32_t yDst,
                                             std::int32_t dxDst, std::int32_t dyDst,
                                             std::int32_t xSrc, std::int32_t ySrc,
                                             std::int32_t dxSrc, std::int32_t dySrc,
                                             bool bEnableAlpha, std::int32_t Transparency,
                                             TResampleFilter Filter,
                                             TZmRenderOperation RenderOperation, double Opacity) {
    TZmLookupTable columns;
    TZmLookupTable rows;
    RenderToTZmBitmap(Dest, &columns, &rows, /*UpdRect=*/nullptr, xDst, yDst, dxDst, dyDst, xSrc,
                      ySrc, dxSrc, dySrc, bEnableAlpha, /*SolidBackground=*/false, Transparency,
                      Filter, /*FreeTables=*/true, RenderOperation, Opacity);
}

void TZmBitmapRendering::DrawToTZmBitmap(TZmBitmap* Dest, std::int32_t XDest, std::int32_t YDest) {
    DrawToTZmBitmap(Dest, XDest, YDest, TRect{0, 0, GetWidth(), GetHeight()});
}

void TZmBitmapRendering::DrawToTZmBitmap(TZmBitmap* Dest, std::int32_t XDest, std::int32_t YDest,
                                         const TRect& SrcRect) {
    const std::int32_t width = SideOf(SrcRect.left, SrcRect.right);
    const std::int32_t height = SideOf(SrcRect.top, SrcRect.bottom);
    RenderToTZmBitmapEx(Dest, XDest, YDest, width, height, SrcRect.left, SrcRect.top, width, height,
                        /*bEnableAlpha=*/true, 255, rfNone, zmlNormal, 1.0);
}

void TZmBitmapRendering::DrawToTZmBitmap(TZmBitmap* Dest, const TRect& DestRect,
                                         const TRect& SrcRect, TResampleFilter Filter) {
    RenderToTZmBitmapEx(Dest, DestRect.left, DestRect.top, SideOf(DestRect.left, DestRect.right),
                        SideOf(DestRect.top, DestRect.bottom), SrcRect.left, SrcRect.top,
                        SideOf(SrcRect.left, SrcRect.right), SideOf(SrcRect.top, SrcRect.bottom),
                        /*bEnableAlpha=*/true, 255, Filter, zmlNormal, 1.0);
}

void TZmBitmapRendering::RenderToTBitmap(TBitmap* ABitmap, TZmLookupTable* XLUT,
                                         TZmLookupTable* YLUT, const TRect* UpdRect,
                                         std::int32_t xDst, std::int32_t yDst, std::int32_t dxDst,
                                         std::int32_t dyDst, std::int32_t xSrc, std::int32_t ySrc,
                                         std::int32_t dxSrc, std::int32_t dySrc, bool EnableAlpha,
                                         bool SolidBackground, std::int32_t Transparency,
                                         TResampleFilter Filter, bool FreeTables,
                                         TZmRenderOperation RenderOperation, double Opacity) {
    if (ABitmap == nullptr) {
        return;
    }
    TZmBitmap wrapper;
    wrapper.EncapsulateTBitmap(ABitmap, /*do_free_image=*/false);
    RenderToTZmBitmap(&wrapper, XLUT, YLUT, UpdRect, xDst, yDst, dxDst, dyDst, xSrc, ySrc, dxSrc,
                      dySrc, EnableAlpha, SolidBackground, Transparency, Filter, FreeTables,
                      RenderOperation, Opacity);
}

void TZmBitmapRendering::RenderToTBitmapEx(TBitmap* Dest, std::int32_t xDst, std::int32_t yDst,
                                           std::int32_t dxDst, std::int32_t dyDst,
                                           std::int32_t xSrc, std::int32_t ySrc, std::int32_t dxSrc,
                                           std::int32_t dySrc, bool bEnableAlpha,
                                           std::int32_t Transparency, TResampleFilter Filter,
                                           TZmRenderOperation RenderOperation, double Opacity) {
    if (Dest == nullptr) {
        return;
    }
    TZmBitmap wrapper;
    wrapper.EncapsulateTBitmap(Dest, /*do_free_image=*/false);
    RenderToTZmBitmapEx(&wrapper, xDst, yDst, dxDst, dyDst, xSrc, ySrc, dxSrc, dySrc, bEnableAlpha,
                        Transparency, Filter, RenderOperation, Opacity);
}

}  // namespace zm
