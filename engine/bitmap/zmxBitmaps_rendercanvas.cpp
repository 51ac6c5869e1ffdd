/// Drawing to canvases, by block transfers or in strips.

#include <algorithm>
#include <array>
#include <cmath>
#include <numeric>

#include "engine/bitmap/zmrendercanvas.h"
#include "engine/foundation/zmnumbers.h"

namespace zm {
namespace {

constexpr std::int64_t kStripBytes = 4 << 20;

std::int32_t SideOf(std::int32_t first, std::int32_t last) {
    return SaturateToInt32(std::int64_t{last} - first);
}

/// Right and bottom exclusive; sides that leave 32 bits end there.
TRect RectOf(std::int32_t x, std::int32_t y, std::int32_t width, std::int32_t height) {
    return TRect{x, y, SaturateToInt32(std::int64_t{x} + width),
                 SaturateToInt32(std::int64_t{y} + height)};
}

/// The largest rectangle of an image's proportions in the middle of another.
TRect FitProportions(const TRect& rect, std::int32_t image_width, std::int32_t image_height) {
    const std::int32_t width = SideOf(rect.left, rect.right);
    const std::int32_t height = SideOf(rect.top, rect.bottom);
    const double scale = std::min(static_cast<double>(width) / image_width,
                                  static_cast<double>(height) / image_height);
    const std::int32_t fit_width = std::clamp(RoundHalfEven(image_width * scale), 1, width);
    const std::int32_t fit_height = std::clamp(RoundHalfEven(image_height * scale), 1, height);
    return RectOf(rect.left + (width - fit_width) / 2, rect.top + (height - fit_height) / 2,
                  fit_width, fit_height);
}

/// Fills what a rectangle leaves of the one around it.
void FillAround(TZmRenderCanvas& canvas, const TRect& outer, const TRect& inner, TColor color) {
    const TRect bands[] = {{outer.left, outer.top, outer.right, inner.top},
                           {outer.left, inner.bottom, outer.right, outer.bottom},
                           {outer.left, inner.top, inner.left, inner.bottom},
                           {inner.right, inner.top, outer.right, inner.bottom}};
    for (const TRect& band : bands) {
        if (band.left < band.right && band.top < band.bottom) {
            canvas.FillRect(band, color);
        }
    }
}

using TGammaTable = std::array<std::uint8_t, 256>;

TGammaTable MakeGammaTable(double gamma) {
    TGammaTable table{};
    for (std::size_t i = 0; i < table.size(); ++i) {
        const double value = static_cast<double>(i) / 255.0;
        table[i] = gamma > 0 ? Clamp8(RoundHalfEven(255.0 * std::pow(value, 1.0 / gamma)))
                             : static_cast<std::uint8_t>(i);
    }
    return table;
}

void ApplyGamma(TZmBitmap& strip, const TGammaTable& table) {
    const std::int64_t bytes = std::int64_t{strip.GetWidth()} * 3;
    for (std::int32_t y = 0; y < strip.GetHeight(); ++y) {
        std::uint8_t* const row = strip.GetScanLine(y);
        std::transform(row, row + bytes, row, [&table](std::uint8_t v) { return table[v]; });
    }
}

/// Rows of a strip that keep it within its memory. Where that is possible strips begin at whole
/// source rows, so that their pictures join.
std::int32_t StripHeight(std::int32_t width, std::int32_t height, std::int32_t source_height) {
    const auto limit = static_cast<std::int32_t>(
        std::clamp<std::int64_t>(kStripBytes / (std::int64_t{width} * 3), 1, height));
    const std::int32_t whole_rows = height / std::gcd(height, source_height);
    return limit < height && limit >= whole_rows ? limit / whole_rows * whole_rows : limit;
}

}  // namespace

// The canvas of a platform bitmap.

TBitmapCanvas::TBitmapCanvas(TBitmap& bitmap) {
    pixels_.EncapsulateTBitmap(&bitmap, /*do_free_image=*/false);
}

void TBitmapCanvas::ReadBlock(std::int32_t x, std::int32_t y, TZmBitmap& block) {
    pixels_.CopyRectTo(&block, x, y, 0, 0, block.GetWidth(), block.GetHeight(),
                       /*copy_alpha=*/false);
}

void TBitmapCanvas::WriteBlock(std::int32_t x, std::int32_t y, TZmBitmap& block) {
    block.CopyRectTo(&pixels_, 0, 0, x, y, block.GetWidth(), block.GetHeight(),
                     /*copy_alpha=*/false);
}

void TBitmapCanvas::StretchImage(const TRect& rect, TZmBitmap& image) {
    image.StretchRectTo(&pixels_, rect.left, rect.top, SideOf(rect.left, rect.right),
                        SideOf(rect.top, rect.bottom), 0, 0, image.GetWidth(), image.GetHeight(),
                        rfNone, 255, 1.0);
}

void TBitmapCanvas::FillRect(const TRect& rect, TColor color) {
    TZmBitmap block;
    const std::int32_t left = std::max(rect.left, 0);
    const std::int32_t top = std::max(rect.top, 0);
    const std::int32_t right = std::min(rect.right, pixels_.GetWidth());
    const std::int32_t bottom = std::min(rect.bottom, pixels_.GetHeight());
    if (left < right && top < bottom &&
        block.Allocate(right - left, bottom - top, color, /*alpha=*/255)) {
        WriteBlock(left, top, block);
    }
}

// The entries.

void TZmBitmapRendering::RenderToCanvasWithAlpha(
    TZmRenderCanvas* Dest, std::int32_t xDst, std::int32_t yDst, std::int32_t dxDst,
    std::int32_t dyDst, std::int32_t xSrc, std::int32_t ySrc, std::int32_t dxSrc,
    std::int32_t dySrc, std::int32_t Transparency, TResampleFilter Filter,
    TZmRenderOperation RenderOperation, double Opacity) {
    TZmBitmap block;
    if (Dest == nullptr || !block.Allocate(dxDst, dyDst, TColor{0}, /*alpha=*/255)) {
        return;
    }
    Dest->ReadBlock(xDst, yDst, block);
    RenderToTZmBitmapEx(&block, 0, 0, dxDst, dyDst, xSrc, ySrc, dxSrc, dySrc,
                        /*bEnableAlpha=*/true, Transparency, Filter, RenderOperation, Opacity);
    Dest->WriteBlock(xDst, yDst, block);
}

void TZmBitmapRendering::DrawToCanvas(TZmRenderCanvas* DestCanvas, std::int32_t xDst,
                                      std::int32_t yDst) {
    RenderToCanvas(DestCanvas, xDst, yDst, GetWidth(), GetHeight(), rfNone, /*Gamma=*/1.0,
                   /*BackgroundColor=*/0, /*MaintainAR=*/false);
}

void TZmBitmapRendering::DrawToCanvasWithAlpha(TZmRenderCanvas* DestCanvas, std::int32_t xDst,
                                               std::int32_t yDst, std::int32_t Transparency,
                                               double Opacity) {
    RenderToCanvasWithAlpha(DestCanvas, xDst, yDst, GetWidth(), GetHeight(), 0, 0, GetWidth(),
                            GetHeight(), Transparency, rfNone, zmlNormal, Opacity);
}

void TZmBitmapRendering::RenderToCanvas(TZmRenderCanvas* DestCanvas, std::int32_t xDst,
                                        std::int32_t yDst, std::int32_t dxDst, std::int32_t dyDst,
                                        TResampleFilter Filter, double Gamma,
                                        TColor BackgroundColor, bool MaintainAR) {
    if (DestCanvas == nullptr || Self().IsEmpty() || dxDst < 1 || dyDst < 1) {
        return;
    }
    TRect rect = RectOf(xDst, yDst, dxDst, dyDst);
    if (MaintainAR) {
        const TRect outer = rect;
        rect = FitProportions(outer, GetWidth(), GetHeight());
        FillAround(*DestCanvas, outer, rect, BackgroundColor);
    }
    if ((Filter == rfNone && Gamma == 1.0) || Gamma == 0.0) {
        DestCanvas->StretchImage(rect, Self());
        return;
    }
    const TGammaTable gamma = MakeGammaTable(Gamma);
    const std::int32_t width = SideOf(rect.left, rect.right);
    const std::int32_t height = SideOf(rect.top, rect.bottom);
    const std::int32_t strip_height = StripHeight(width, height, GetHeight());
    TZmBitmap strip;
    for (std::int64_t y = 0; y < height; y += strip_height) {
        const std::int32_t done = static_cast<std::int32_t>(y);
        const std::int32_t rows = std::min(strip_height, height - done);
        if (!strip.Allocate(width, rows, BackgroundColor, /*alpha=*/255)) {
            return;
        }
        RenderToTZmBitmapEx(&strip, 0, -done, width, height, 0, 0, GetWidth(), GetHeight(),
                            /*bEnableAlpha=*/false, 255, Filter, zmlNormal, 1.0);
        ApplyGamma(strip, gamma);
        DestCanvas->WriteBlock(rect.left, rect.top + done, strip);
    }
}

}  // namespace zm
