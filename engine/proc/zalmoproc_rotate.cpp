// Rotate and Flip of the processor.

#include <cmath>
#include <string>

#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmstrings.h"
#include "engine/proc/zalmoproc.h"

namespace zm {
namespace {

constexpr TColor kOwnBackground = -1;

/// As "Rotate 45°", the angle without its fraction.
std::u16string RotationCaption(double angle) {
    const std::string degrees = std::to_string(TruncToInt(angle));
    return OperationCaption(kOperationRotate) + u" " + Utf16FromUtf8(degrees) + u"\u00B0";
}

}  // namespace

void TZalmoProc::Rotate(double angle, TZmAntialiasMode mode, TColor background) {
    if (angle == 0 || !std::isfinite(angle) ||
        !MakeConsistent(TZmPixelFormatSet(), /*check_view=*/false) || fZmBitmap->IsEmpty()) {
        return;
    }
    if (fAutoUndo) {
        SaveUndo(RotationCaption(angle), zmuImage, /*clear_redo=*/true, kOperationRotate);
    }
    fZmBitmap->RotateEx(angle, mode, background == kOwnBackground ? fBackground : background, this,
                        fOnProgress);
    Update();
    if (fOnFinishWork) {
        fOnFinishWork(this);
    }
}

void TZalmoProc::Rotate(double angle, bool antialias, TZmAntialiasMode mode, TColor background) {
    Rotate(angle, antialias ? mode : zmrNone, background);
}

void TZalmoProc::Flip(TFlipDir direction) {
    if ((direction != fdHorizontal && direction != fdVertical) ||
        !MakeConsistent(TZmPixelFormatSet(), /*check_view=*/false) || fZmBitmap->IsEmpty()) {
        return;
    }
    if (fAutoUndo) {
        const std::int32_t operation =
            direction == fdHorizontal ? kOperationFlipHorizontal : kOperationFlipVertical;
        SaveUndo(OperationCaption(operation), zmuImage, /*clear_redo=*/true, operation);
    }
    fZmBitmap->Flip(direction);
    Update();
    if (fOnFinishWork) {
        fOnFinishWork(this);
    }
}

}  // namespace zm
