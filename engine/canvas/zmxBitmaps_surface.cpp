#include "engine/foundation/zmassert.h"
#include "engine/bitmap/zmxBitmaps.h"

namespace zm {

void TCanvasDeleter::operator()(TCanvas* canvas) const {
    ZM_ASSERT(canvas == nullptr);
}

void TZmCanvasDeleter::operator()(TZmCanvas* canvas) const {
    ZM_ASSERT(canvas == nullptr);
}

void TZmBitmapSurface::FinishROI() {}

}  // namespace zm
