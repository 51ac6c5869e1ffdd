/// The part of the renderer that resamples: the scaled path, and scaled copies between bitmaps of
/// any format.

#include <algorithm>
#include <utility>
#include <vector>

#include "engine/bitmap/zmrender_p.h"
#include "engine/bitmap/zmvirtualbitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/proc/zmresample.h"

namespace zm {
namespace {

bool IsProjection(TResampleFilter filter) {
    return filter == rfProjectBW || filter == rfProjectWB;
}

/// Source pixel of a destination edge: a position between pixels, 0 to `limit`.
std::int32_t SourceEdge(std::int32_t edge, std::int32_t dest, std::int32_t source, double ratio,
                        std::int32_t limit) {
    const double offset = static_cast<double>(edge) - dest;
    return std::clamp(TruncToInt(offset * ratio + source), 0, limit);
}

/// The source pixels that a part of the destination shows; at least one.
TRect FindSourceRect(const TZmRenderCall& call, const TRect& visible, TZmBitmap& source) {
    const std::int32_t width = source.GetWidth();
    const std::int32_t height = source.GetHeight();
    TRect rect;
    rect.left = SourceEdge(visible.left, call.dest.x, call.source.x, call.ratio_x, width - 1);
    rect.top = SourceEdge(visible.top, call.dest.y, call.source.y, call.ratio_y, height - 1);
    rect.right = SourceEdge(visible.right, call.dest.x, call.source.x, call.ratio_x, width);
    rect.bottom = SourceEdge(visible.bottom, call.dest.y, call.source.y, call.ratio_y, height);
    rect.right = std::max(rect.right, rect.left + 1);
    rect.bottom = std::max(rect.bottom, rect.top + 1);
    return rect;
}

/// First and last source pixel, inclusive, of each target pixel of an axis: half a footprint to
/// both sides of its position. The last one reaches to the end, so that no pixel is left out.
std::vector<TRect> MakeFootprints(std::int32_t source_size, std::int32_t target_size, double half) {
    std::vector<TRect> footprints(static_cast<std::size_t>(target_size));
    const double ratio = static_cast<double>(source_size) / target_size;
    for (std::int32_t i = 0; i < target_size; ++i) {
        TRect& footprint = footprints[static_cast<std::size_t>(i)];
        footprint.left = std::clamp(TruncToInt(i * ratio - ratio / 2), 0, source_size - 1);
        footprint.right = std::clamp(TruncToInt(i * ratio + half), 0, source_size - 1);
    }
    footprints.back().right = source_size - 1;
    return footprints;
}

/// Set bits to the left of each column, over the rows of a footprint.
void CountSetBits(TZmBitmap& source, const TRect& rows, std::vector<std::int64_t>& set_bits) {
    std::fill(set_bits.begin(), set_bits.end(), 0);
    for (std::int32_t y = rows.left; y <= rows.right; ++y) {
        const std::uint8_t* const row = source.GetScanLine(y);
        for (std::size_t x = 0; row != nullptr && x + 1 < set_bits.size(); ++x) {
            set_bits[x + 1] += row[x >> 3] >> (7 - (x & 7)) & 1;
        }
    }
    for (std::size_t x = 1; x < set_bits.size(); ++x) {
        set_bits[x] += set_bits[x - 1];
    }
}

/// Shrinks bits to greys in a zm24RGB target, the share of white in each pixel's footprint. The
/// footprints are those of the resampler's reduction; only the last ones, which there end half a
/// footprint before the edge, are completed: every black pixel darkens what is shown.
void ShrinkBits(TZmBitmap& source, TZmBitmap& target) {
    const std::int32_t width = target.GetWidth();
    const double ratio_x = static_cast<double>(source.GetWidth()) / width;
    const double ratio_y = static_cast<double>(source.GetHeight()) / target.GetHeight();
    const auto columns = MakeFootprints(source.GetWidth(), width, ratio_x / 2);
    const auto rows =
        MakeFootprints(source.GetHeight(), target.GetHeight(), TruncToInt(ratio_y) / 2.0);
    std::vector<std::int64_t> set_bits(static_cast<std::size_t>(source.GetWidth()) + 1);
    for (std::int32_t y = 0; y < target.GetHeight(); ++y) {
        const TRect& lines = rows[static_cast<std::size_t>(y)];
        CountSetBits(source, lines, set_bits);
        std::uint8_t* out = target.GetScanLine(y);
        for (const TRect& run : columns) {
            const std::int64_t set = set_bits[static_cast<std::size_t>(run.right) + 1] -
                                     set_bits[static_cast<std::size_t>(run.left)];
            const std::int64_t counted = (std::int64_t{lines.right} - lines.left + 1) *
                                         (std::int64_t{run.right} - run.left + 1);
            out = std::fill_n(out, 3, static_cast<std::uint8_t>(set * 255 / counted));
        }
    }
}

/// The pixels of a view as zm24RGB, display adjustments applied, with the view's alpha plane.
bool CopyAsColors(TZmBitmap& view, TZmBitmap& copy) {
    if (!copy.Allocate(view.GetWidth(), view.GetHeight(), zm24RGB)) {
        return false;
    }
    view.RenderToTZmBitmapEx(&copy, 0, 0, view.GetWidth(), view.GetHeight(), 0, 0, view.GetWidth(),
                             view.GetHeight(), /*bEnableAlpha=*/false, 255, rfNone, zmlNormal, 1.0);
    if (TZmBitmap* const plane = view.GetAlphaChannelRaw(); plane != nullptr) {
        auto plane_copy =
            TZmBitmap::CreateAsAlphaChannel(view.GetWidth(), view.GetHeight(), zmMemory);
        plane_copy->AssignEx(plane, /*with_params=*/false);
        copy.ReplaceAlphaChannel(std::move(plane_copy));
    }
    return true;
}

/// The formats that the resampling engines scale as they are. (zm32RGB is none of them: an engine
/// leaves three of its channels out when it enlarges.) Projections of colours end in bits, which
/// the display adjustments have to come before.
bool IsScaledAsItIs(TZmPixelFormat format, TResampleFilter filter) {
    constexpr TZmPixelFormatSet kScaled(zm1g, zm8g, zm16g, zm24RGB, zm48RGB);
    constexpr TZmPixelFormatSet kProjected(zm1g, zm8g, zm16g);
    return IsProjection(filter) ? kProjected.Contains(format) : kScaled.Contains(format);
}

/// Scales a view into `scaled`, which gets the given size, the view's plane and what the display
/// settings still have to do.
bool ScaleView(TZmBitmap& view, TZmBitmap& scaled, std::int32_t width, std::int32_t height,
               TResampleFilter filter) {
    TZmBitmap colors;
    TZmBitmap* source = &view;
    if (!IsScaledAsItIs(view.GetPixelFormat(), filter)) {
        if (!CopyAsColors(view, colors)) {
            return false;
        }
        source = &colors;
    }
    const bool done = scaled.Allocate(width, height, source->GetPixelFormat()) &&
                      ResampleBitmapInto(*source, scaled, filter, nullptr, {});
    scaled.CopyDisplaySettingsFrom(*source);
    return done;
}

TZmRenderRect WholeOf(TZmBitmap& bitmap) {
    return TZmRenderRect{0, 0, bitmap.GetWidth(), bitmap.GetHeight()};
}

/// Whether pixels of one bitmap mean the same in the other.
bool HaveSamePixels(TZmBitmap& a, TZmBitmap& b) {
    return a.GetPixelFormat() == b.GetPixelFormat() &&
           (a.GetPixelFormat() != zm8p || a.GetPaletteArray() == b.GetPaletteArray());
}

/// Copies the source rectangle of a clipped call in the format of both bitmaps; False when the
/// filter has another format as its result.
bool StretchPixels(TZmBitmap& source, const TZmRenderCall& call) {
    TZmVirtualClippedBitmap view(
        source,
        TRect{call.source.x, call.source.y,
              SaturateToInt32(std::int64_t{call.source.x} + call.source.width),
              SaturateToInt32(std::int64_t{call.source.y} + call.source.height)},
        TZmViewAlpha::kWithoutPlane);
    TZmBitmap scaled;
    if (!scaled.Allocate(call.dest.width, call.dest.height, source.GetPixelFormat()) ||
        !ResampleBitmapInto(view, scaled, call.filter, nullptr, {}) ||
        scaled.GetPixelFormat() != source.GetPixelFormat()) {
        return false;
    }
    scaled.CopyRectTo(call.destination, 0, 0, call.dest.x, call.dest.y, call.dest.width,
                      call.dest.height, /*copy_alpha=*/false);
    return true;
}

}  // namespace

/// The tables of the call belong to the whole picture: the drawing of the visible part, which is
/// made here in its final size, has its own.
void TZmBitmapRendering::RenderScaled(const TZmRenderCall& call) {
    const TRect visible = FindVisibleRect(call);
    if (visible.left >= visible.right || visible.top >= visible.bottom) {
        return;
    }
    const std::int32_t width = visible.right - visible.left;
    const std::int32_t height = visible.bottom - visible.top;
    const bool has_plane = FindRenderPlane(*this, call.enable_alpha) != nullptr;
    TZmVirtualClippedBitmap view(
        Self(), FindSourceRect(call, visible, Self()),
        has_plane ? TZmViewAlpha::kWithPlane : TZmViewAlpha::kWithoutPlane);
    const bool is_reduced =
        call.dest.width < call.source.width && call.dest.height < call.source.height;
    TZmBitmap scaled;
    if (GetPixelFormat() == zm1g && !has_plane && is_reduced && !IsProjection(call.filter)) {
        if (!scaled.Allocate(width, height, zm24RGB)) {
            return;
        }
        ShrinkBits(view, scaled);
    } else if (!ScaleView(view, scaled, width, height, call.filter)) {
        return;
    }
    TZmRenderCall direct = call;
    direct.columns = nullptr;
    direct.rows = nullptr;
    direct.update_rect = nullptr;
    direct.filter = rfNone;
    direct.dest = TZmRenderRect{visible.left, visible.top, width, height};
    direct.source = WholeOf(scaled);
    scaled.Render(direct);
}

/// A destination that does not take three bytes a pixel is drawn into by way of a zm24RGB copy of
/// the rectangle.
void TZmBitmapRendering::StretchRectTo(TZmBitmap* Dest, std::int32_t xDst, std::int32_t yDst,
                                       std::int32_t dxDst, std::int32_t dyDst, std::int32_t xSrc,
                                       std::int32_t ySrc, std::int32_t dxSrc, std::int32_t dySrc,
                                       TResampleFilter Filter, std::int32_t Transparency,
                                       double Opacity) {
    if (Dest == nullptr || Dest->IsEmpty() || Self().IsEmpty() || dxDst < 1 || dyDst < 1 ||
        dxSrc < 1 || dySrc < 1) {
        return;
    }
    TZmRenderCall call;
    call.destination = Dest;
    call.dest = TZmRenderRect{xDst, yDst, dxDst, dyDst};
    call.source = TZmRenderRect{xSrc, ySrc, dxSrc, dySrc};
    call.filter = Filter;
    call.transparency = Transparency;
    call.opacity = Opacity;
    if (Dest->GetPixelFormat() == zm24RGB) {
        Render(call);
        return;
    }
    TZmRenderCall clipped = call;
    clipped.ratio_x = static_cast<double>(dxSrc) / dxDst;
    clipped.ratio_y = static_cast<double>(dySrc) / dyDst;
    if (!ClipRenderCall(clipped, GetWidth(), GetHeight())) {
        return;
    }
    const bool is_copy = Transparency >= 255 && Opacity >= 1.0 && HaveSamePixels(Self(), *Dest);
    if (is_copy && StretchPixels(Self(), clipped)) {
        return;
    }
    const TZmRenderRect& area = clipped.dest;
    TZmBitmap colors;
    if (!colors.Allocate(area.width, area.height, zm24RGB)) {
        return;
    }
    Dest->CopyRectTo(&colors, area.x, area.y, 0, 0, area.width, area.height,
                     /*copy_alpha=*/false);
    call.destination = &colors;
    call.dest.x = SaturateToInt32(std::int64_t{xDst} - area.x);
    call.dest.y = SaturateToInt32(std::int64_t{yDst} - area.y);
    Render(call);
    colors.CopyRectTo(Dest, 0, 0, area.x, area.y, area.width, area.height,
                      /*copy_alpha=*/false);
}

}  // namespace zm
