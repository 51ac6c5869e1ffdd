// The member of TZmBitmap that resamples an alpha plane to the size of its image.

#include "engine/bitmap/zmxBitmaps.h"

namespace zm {

void TZmBitmap::SyncAlphaChannel(bool anti_alias) {
    if (!HasAlphaChannel()) {
        GetAlphaChannel();
        return;
    }
    TZmBitmap& plane = *fAlphaChannel;
    if (IsEmpty() || !plane.SetPixelFormat(zm8g)) {
        return;
    }
    plane.Resample(GetWidth(), fHeight, anti_alias ? rfBicubic : rfNone,
                   /*maintain_aspect_ratio=*/false, /*shrink_only=*/false);
    plane.SyncFull();
    // Required: the mark of this bitmap itself is refreshed too, whatever its format; it goes into
    // the raw form, and callers that treat a grey image as a plane look at it.
    SyncFull();
}

}  // namespace zm
