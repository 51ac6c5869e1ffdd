#pragma once

#include <cstdint>
#include <memory>

#include "engine/bitmap/zmfont.h"
#include "engine/bitmap/zmrender.h"
#include "engine/foundation/zmdefs.h"

namespace zm {

class TImageList;

/// What TZmBitmap shares with the platform's drawing: canvases, regions of interest, platform
/// bitmaps and the clipboard. A class of its own for the length of the list: TZmBitmap is the one
/// class that derives from it. Canvases are defined in engine/canvas, the clipboard in
/// engine/proc.
///
/// Canvases belong to the thread that made them, and none outlives its bitmap.
class TZmBitmapSurface : public TZmBitmapRendering {
public:
    /// The platform canvas. Made when needed, which moves the pixels to the place zmTBitmap, with
    /// that place's limits (see Allocate). Nil for an empty image. Owned by the bitmap; gone with
    /// the next reallocation.
    TCanvas* GetCanvas();
    /// An antialiasing canvas over the platform canvas, made when needed; ownership as there.
    /// Raises EZmException where the platform has no drawing library.
    TZmCanvas* GetZmCanvas();
    /// The font of the platform canvas, which is kept without one: setting it moves no pixels.
    TFont& GetCanvasFont() { return fCanvasFont; }

    /// A bitmap to draw on in place of a rectangle of this one (right and bottom exclusive, any
    /// position). When it goes, what was drawn comes back here: with `PerformAlphaCompositing` it
    /// starts as transparent zm32RGB and goes over the pixels and the plane by its own alpha;
    /// otherwise it starts as a copy and replaces the pixels, the plane staying as it is. Nil
    /// without room. This bitmap must outlive it.
    std::unique_ptr<TZmBitmap> CreateROIBitmap(const TRect& Rect, bool PerformAlphaCompositing);
    /// A canvas on such a bitmap, which goes with the canvas. Coordinates are the region's own.
    /// Raises EZmException where the platform cannot draw.
    std::unique_ptr<TZmCanvas, TZmCanvasDeleter> CreateROICanvas(const TRect& Rect, bool AntiAlias,
                                                                 bool UseGDIPlus,
                                                                 bool PerformAlphaCompositing);
    /// Lays a zm32RGB bitmap, its fourth byte as alpha, over this one of any format at x, y,
    /// clipped. Alpha is limited to `Transparency` (0 to 255), then times `Opacity` (0 to 1).
    /// With a plane, colours and plane follow the rule of one picture over another.
    void MergeWithAlpha(TZmBitmap* Bitmap, std::int32_t DstX, std::int32_t DstY,
                        std::int32_t Transparency, double Opacity);

    // Platform bitmaps. Formats that these cannot hold raise EZmException.
    void CopyFromTBitmap(TBitmap* Source);
    void CopyToTBitmap(TBitmap* Dest);
    /// Adds a copy of the image to a list of platform bitmaps; its index there, -1 for a nil list
    /// and without room.
    std::int32_t AddToImageList(TImageList* Dest);

    // Clipboard. False when it cannot be opened, the image is smaller than 2 by 2, or nothing
    // that fits is there. Exact rules beside the definitions.
    bool CopyToClipboard(bool IncludeZalmoFormat, bool IncludePNGFormat, std::int32_t DpiX,
                         std::int32_t DpiY);
    bool PasteFromClipboard();

protected:
    /// What the destructor of a region's bitmap runs first: its canvas goes, and what was drawn
    /// returns to the original. Does nothing for other bitmaps.
    void FinishROI();
};

}  // namespace zm
