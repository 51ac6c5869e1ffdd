#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "engine/bitmap/zmbitmapstate.h"
#include "engine/bitmap/zmblend.h"
#include "engine/foundation/zmdefs.h"

namespace zm {

class TZmRenderCanvas;
struct TZmRenderCall;
struct TZmRenderTransfer;

/// Source column of each column (row of each row) of a destination rectangle, from its left (top)
/// edge on. An empty table counts as none.
using TZmLookupTable = std::vector<std::int32_t>;

/// What TZmBitmap can draw, in a class of its own for the length of the list: TZmBitmap alone
/// derives from it, by way of TZmBitmapSurface. `this` is the source of every drawing.
///
/// A rectangle of the source is drawn into a rectangle of a destination at any scale. Rectangles
/// are given by position and size; they may lie anywhere, are clipped to both images, and draw
/// nothing when a size is 0 or negative. Pixels pass these stages: the format's way to RGB with
/// the display adjustments, the render operation, the mixing by alpha. The weight of a pixel is
/// A / 256 with A the smaller of its alpha and `Transparency`, times `Opacity`, truncated.
/// The destination's own alpha plane is not touched.
///
/// Destinations take three bytes a pixel: zm24RGB. Other formats are the caller's mistake: their
/// bytes are written as if they were colours, as far as a row has room for that, and nothing is
/// drawn where it has not. Drawing an image into itself goes row by row from the top, pixel by
/// pixel from the left, and reads what it has written.
class TZmBitmapRendering : public TZmBitmapState {
public:
    virtual TZmBitmap* GetAlphaChannel() = 0;
    virtual TZmBitmap* GetAlphaChannelRaw() = 0;

    // Pixel transfer: for each format one routine that writes pixels and one that mixes them by
    // alpha; the last pair reads any format through GetPixels. They take rows and columns as the
    // transfer's tables tell, without a test.
    virtual void TransferPixels_zm1g(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm1g(const TZmRenderTransfer& transfer);
    /// With an empty palette nothing is drawn.
    virtual void TransferPixels_zm8p(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm8p(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zm8g(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm8g(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zm16g(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm16g(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zm24RGB(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm24RGB(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zm32f(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm32f(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zmCMYK(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zmCMYK(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zm48RGB(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm48RGB(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zmCIELab(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zmCIELab(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_zm32RGB(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_zm32RGB(const TZmRenderTransfer& transfer);
    virtual void TransferPixels_any(const TZmRenderTransfer& transfer);
    virtual void BlendPixels_any(const TZmRenderTransfer& transfer);

    /// The one routine behind all drawing.
    ///
    /// XLUT, YLUT: tables in and out, or nil. A table with an entry for each column (row) of the
    /// clipped rectangle is used, entries outside the source counting as its edge; otherwise one
    /// is made and left to the caller, unless `FreeTables` empties both at the end. Tables serve
    /// calls that differ in `UpdRect` alone. A scaled drawing and a one-to-one copy of zm24RGB
    /// make none.
    ///
    /// UpdRect: restricts the work to this rectangle of the destination, right and bottom
    /// exclusive; nil for all of it. SolidBackground: the destination is a plain fill, so that a
    /// source row that repeats may be copied from the destination row above. Transparency: 0 to
    /// 255, the ceiling of alpha. Opacity: 0 to 1. Both are limited to these ranges.
    ///
    /// Without a plane, or with `EnableAlpha` False, a source counts as filled with the alpha
    /// Transparency * Opacity, so that Opacity acts twice. Pixels beyond a plane that is smaller
    /// than its image count as opaque.
    ///
    /// Filter: rfNone takes the nearest pixel. Others resample the visible part when the sizes
    /// differ (see the resampling header; the kernel filters may use worker threads). Exceptions
    /// of the allocator pass through.
    void RenderToTZmBitmap(TZmBitmap* ABitmap, TZmLookupTable* XLUT, TZmLookupTable* YLUT,
                           const TRect* UpdRect, std::int32_t xDst, std::int32_t yDst,
                           std::int32_t dxDst, std::int32_t dyDst, std::int32_t xSrc,
                           std::int32_t ySrc, std::int32_t dxSrc, std::int32_t dySrc,
                           bool EnableAlpha, bool SolidBackground, std::int32_t Transparency,
                           TResampleFilter Filter, bool FreeTables,
                           TZmRenderOperation RenderOperation, double Opacity);
    /// RenderToTZmBitmap without tables, update rectangle and solid background.
    void RenderToTZmBitmapEx(TZmBitmap* Dest, std::int32_t xDst, std::int32_t yDst,
                             std::int32_t dxDst, std::int32_t dyDst, std::int32_t xSrc,
                             std::int32_t ySrc, std::int32_t dxSrc, std::int32_t dySrc,
                             bool bEnableAlpha, std::int32_t Transparency, TResampleFilter Filter,
                             TZmRenderOperation RenderOperation, double Opacity);
    /// The whole image / a rectangle of it at its own size, with alpha / a rectangle scaled into
    /// another.
    void DrawToTZmBitmap(TZmBitmap* Dest, std::int32_t XDest, std::int32_t YDest);
    void DrawToTZmBitmap(TZmBitmap* Dest, std::int32_t XDest, std::int32_t YDest,
                         const TRect& SrcRect);
    void DrawToTZmBitmap(TZmBitmap* Dest, const TRect& DestRect, const TRect& SrcRect,
                         TResampleFilter Filter);
    /// The same into a platform bitmap, of 24 bits a pixel.
    void RenderToTBitmap(TBitmap* ABitmap, TZmLookupTable* XLUT, TZmLookupTable* YLUT,
                         const TRect* UpdRect, std::int32_t xDst, std::int32_t yDst,
                         std::int32_t dxDst, std::int32_t dyDst, std::int32_t xSrc,
                         std::int32_t ySrc, std::int32_t dxSrc, std::int32_t dySrc,
                         bool EnableAlpha, bool SolidBackground, std::int32_t Transparency,
                         TResampleFilter Filter, bool FreeTables,
                         TZmRenderOperation RenderOperation, double Opacity);
    void RenderToTBitmapEx(TBitmap* Dest, std::int32_t xDst, std::int32_t yDst, std::int32_t dxDst,
                           std::int32_t dyDst, std::int32_t xSrc, std::int32_t ySrc,
                           std::int32_t dxSrc, std::int32_t dySrc, bool bEnableAlpha,
                           std::int32_t Transparency, TResampleFilter Filter,
                           TZmRenderOperation RenderOperation, double Opacity);
    /// Onto a canvas: the rectangle is read from it, drawn into with alpha, and written back.
    void RenderToCanvasWithAlpha(TZmRenderCanvas* Dest, std::int32_t xDst, std::int32_t yDst,
                                 std::int32_t dxDst, std::int32_t dyDst, std::int32_t xSrc,
                                 std::int32_t ySrc, std::int32_t dxSrc, std::int32_t dySrc,
                                 std::int32_t Transparency, TResampleFilter Filter,
                                 TZmRenderOperation RenderOperation, double Opacity);
    /// The whole image at its own size, as the device draws pictures / with alpha.
    void DrawToCanvas(TZmRenderCanvas* DestCanvas, std::int32_t xDst, std::int32_t yDst);
    void DrawToCanvasWithAlpha(TZmRenderCanvas* DestCanvas, std::int32_t xDst, std::int32_t yDst,
                               std::int32_t Transparency, double Opacity);
    /// For printing: the whole image in a rectangle, without alpha. With `MaintainAR` in its own
    /// proportions, centred, the rest filled. Without a filter and with `Gamma` 1, or with
    /// `Gamma` 0, the device scales; else the image is scaled, and corrected by 1 / Gamma as
    /// exponent, in strips of bounded memory.
    void RenderToCanvas(TZmRenderCanvas* DestCanvas, std::int32_t xDst, std::int32_t yDst,
                        std::int32_t dxDst, std::int32_t dyDst, TResampleFilter Filter,
                        double Gamma, TColor BackgroundColor, bool MaintainAR);
    /// A scaled copy into a destination of any format, without the source's alpha. Equal formats
    /// keep their depth when nothing is mixed; all else goes through RGB. (Engine/proc.)
    void StretchRectTo(TZmBitmap* Dest, std::int32_t xDst, std::int32_t yDst, std::int32_t dxDst,
                       std::int32_t dyDst, std::int32_t xSrc, std::int32_t ySrc, std::int32_t dxSrc,
                       std::int32_t dySrc, TResampleFilter Filter, std::int32_t Transparency,
                       double Opacity);

    // Display adjustments: what rendering shows of the pixels, which keep their values. Range:
    // greys in the format's own units, 8-bit and 48-bit colours in bytes; it acts when the two
    // values differ.
    double GetBlackValue() const { return fBlackValue; }
    void SetBlackValue(double value) { fBlackValue = value; }
    double GetWhiteValue() const { return fWhiteValue; }
    void SetWhiteValue(double value) { fWhiteValue = value; }
    /// Added to a channel (0 red, 1 green, 2 blue) of zm24RGB and zm48RGB while enabled.
    std::int32_t GetChannelOffset(std::size_t channel) const;
    void SetChannelOffset(std::size_t channel, std::int32_t value);
    bool GetEnableChannelOffset() const { return fEnableChannelOffset; }
    void SetEnableChannelOffset(bool enable) { fEnableChannelOffset = enable; }
    /// Of zm24RGB and zm48RGB: 0 none, positive more (10 doubles it), -100 flat grey.
    std::int32_t GetContrast() const { return fContrast; }
    void SetContrast(std::int32_t value) { fContrast = value; }
    void CopyDisplaySettingsFrom(const TZmBitmapRendering& source);

private:
    TZmBitmap& Self();
    void Render(TZmRenderCall call);
    void RenderDirect(const TZmRenderCall& call);
    void RenderScaled(const TZmRenderCall& call);  // defined beside the resampler
    void TransferPixels(const TZmRenderTransfer& transfer, bool is_blending);
    bool IsPlainCopy(const TZmRenderCall& call, bool is_blending);
};

}  // namespace zm
