/// The canvas itself: its making, modes and transform.

#include "engine/canvas/zmgdiplus.h"

#include <algorithm>
#include <cmath>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/canvas/zmgdiplus_p.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"

namespace zm {

platform::TArgb ZmColorToARGB(TColor Color, std::int32_t Alpha) {
    return platform::MakeArgb(Clamp8(Alpha), RGBFromColor(ColorToRGB(Color)));
}

TZmLibraryHold::TZmLibraryHold(bool is_wanted)
    : is_wanted_(is_wanted && ZmGlobalSettings().fUseGDIPlus) {
    if (is_wanted_) {
        is_bound_ = platform::BindVectorGraphics(platform::TLibraryLoading::kAllowed);
    }
}

TZmLibraryHold::~TZmLibraryHold() {
    if (is_wanted_) {
        platform::UnbindVectorGraphics(platform::TUnbinding::kCounted);
    }
}

TZmCanvas::TZmCanvas(TCanvas& Canvas, bool AntiAlias, bool UseGDIPlus, TBitmap* Bitmap)
    : hold_(UseGDIPlus), fCanvas(Canvas), fUseGDIPlus(hold_.IsWanted()) {
    fPen = std::make_unique<TZmPen>(&Canvas.Pen, UseGDIPlus);
    fBrush = std::make_unique<TZmBrush>(&Canvas.Brush, UseGDIPlus);
    fCanvasHandle = Canvas.GetHandle();
    if (fUseGDIPlus) {
        TBitmap& bitmap = Bitmap != nullptr ? *Bitmap : Canvas.GetBitmap();
        fGraphics = platform::CreateVectorGraphics(bitmap.GetDrawTarget());
        if (fGraphics == nullptr) {
            throw EZmException("Cannot create TZmCanvas. Ensure GDI+ is installed on system.");
        }
        Canvas.SaveState();
        fSavedDC = true;
    }
    SetSmoothingMode(AntiAlias ? zmsmAntialias : zmsmBestPerformance);
    SetTextRendering(AntiAlias ? zmtrTextRenderingHintAntiAlias
                               : zmtrTextRenderingHintSystemDefault);
}

TZmCanvas::~TZmCanvas() {
    if (fOnDestroy) {
        fOnDestroy(this);
    }
    fBrush.reset();
    fPen.reset();
    fGraphics.reset();
    if (fSavedDC) {
        fCanvas.RestoreState();
    }
    // The bitmap owns the platform canvas and takes what was drawn to its original: last of all.
    fROIBitmap.reset();
}

void TZmCanvas::SetROIBitmap(std::unique_ptr<TZmBitmap> Bitmap) {
    fROIBitmap = std::move(Bitmap);
}

TRect TZmCanvas::GetTouchedRect() const {
    if (fGraphics != nullptr) {
        return fGraphics->TouchedRect();
    }
    const TBitmap& bitmap = fCanvas.GetBitmap();
    return TRect{0, 0, bitmap.GetWidth(), bitmap.GetHeight()};
}

// Modes. The values of the first two families begin at -1 in the library.

void TZmCanvas::SetSmoothingMode(TZmCanvasSmoothingMode Mode) {
    if (fGraphics == nullptr || fGraphics->SetSmoothingMode(Mode - 1)) {
        fSmoothingMode = Mode;
    }
}

void TZmCanvas::SetInterpolationMode(TZmCanvasInterpolationMode Mode) {
    if (fGraphics == nullptr || fGraphics->SetInterpolationMode(Mode - 1)) {
        fInterpolationMode = Mode;
    }
}

void TZmCanvas::SetTextRendering(TZmTextRenderingHintMode Mode) {
    if (fGraphics == nullptr || fGraphics->SetTextRenderingHint(Mode)) {
        fTextRendering = Mode;
    }
}

void TZmCanvas::SetCompositingMode(TZmCanvasCompositingMode Mode,
                                   TZmCanvasCompositingQuality Quality) {
    if (fGraphics != nullptr) {
        fGraphics->SetCompositingMode(Mode);
        fGraphics->SetCompositingQuality(Quality);
    }
}

// World transform.

void TZmCanvas::Rotate(double Angle) {
    if (fGraphics != nullptr) {
        fGraphics->RotateTransform(static_cast<float>(Angle));
    }
}

void TZmCanvas::Translate(std::int32_t DX, std::int32_t DY) {
    if (fGraphics != nullptr) {
        fGraphics->TranslateTransform(static_cast<float>(DX), static_cast<float>(DY));
    }
    // Required: ResetTransform does not undo this one. Drawing that mixes both canvases has
    // always found the platform's origin moved.
    fCanvas.OffsetViewportOrg(DX, DY);
}

void TZmCanvas::Scale(double SX, double SY) {
    if (fGraphics != nullptr) {
        fGraphics->ScaleTransform(static_cast<float>(SX), static_cast<float>(SY));
    }
}

void TZmCanvas::ResetTransform() {
    if (fGraphics != nullptr) {
        fGraphics->ResetTransform();
    }
}

void TZmCanvas::Flush() {
    if (fGraphics != nullptr) {
        fGraphics->Flush();
    }
}

// The canvas without a target.

TZmTempBitmap::TZmTempBitmap() : fTempCanvas(fTempBitmap) {
    constexpr std::int32_t kSide = 8;
    if (!fTempBitmap.SetSize(kSide, kSide, pf32bit)) {
        throw std::bad_alloc();
    }
}

TZmEmptyCanvas::TZmEmptyCanvas()
    : TZmCanvas(fTempCanvas, /*AntiAlias=*/true, /*UseGDIPlus=*/true, &fTempBitmap) {}

}  // namespace zm
