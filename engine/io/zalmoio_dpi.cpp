#include "engine/bitmap/zmxBitmaps.h"
#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/io/zalmoio.h"
#include "engine/io/zmimagelimits.h"
#include "engine/proc/zmresample.h"

// Making the resolutions of a loaded image equal.
namespace zm {

namespace {

bool Stretch(TZmBitmap& source, TZmBitmap& target, TResampleFilter filter) {
    return !target.IsEmpty() && ResampleBitmapInto(source, target, filter, nullptr, {});
}

}  // namespace

/// After a load to a wanted size the parameters hold that size: the bitmap's own counts. What the
/// resolutions ask for is limited as what a file's header asks for.
void TZalmoIO::AdjustDPI(std::int64_t file_bytes) {
    TIOParams& params = *GetParams();
    const std::int32_t dpi_x = params.GetDpiX();
    const std::int32_t dpi_y = params.GetDpiY();
    const bool has_sizes = !fZmBitmap->IsEmpty() && params.fWidth > 0 && params.fHeight > 0;
    if (!fAutoAdjustDPI || dpi_x == dpi_y || dpi_x <= 0 || dpi_y <= 0 || !has_sizes) {
        return;
    }
    std::int32_t width = fZmBitmap->GetWidth();
    std::int32_t height = fZmBitmap->GetHeight();
    const bool is_wide = width > height;
    if (is_wide) {
        height = TruncToInt(static_cast<double>(height) / dpi_y * dpi_x);
    } else {
        width = TruncToInt(static_cast<double>(width) / dpi_x * dpi_y);
    }
    if (!ImageSizeIsAcceptable(width, height, fZmBitmap->GetBitCount(), file_bytes) ||
        !StretchBitmap(width, height)) {
        return;
    }
    params.fWidth = width;
    params.fHeight = height;
    if (is_wide) {
        params.SetDpiY(dpi_x);
    } else {
        params.SetDpiX(dpi_y);
    }
}

/// False without room; the bitmap is then as it was.
bool TZalmoIO::StretchBitmap(std::int32_t width, std::int32_t height) {
    if (fFilteredAdjustDPI && !fZmBitmap->SetPixelFormat(zm24RGB)) {
        return false;
    }
    const TResampleFilter filter =
        fFilteredAdjustDPI ? ZmGlobalSettings().fDefaultResampleFilter : rfNone;
    TZmBitmap pixels(width, height, fZmBitmap->GetPixelFormat());
    std::unique_ptr<TZmBitmap> alpha;
    if (TZmBitmap* source_alpha = fZmBitmap->GetAlphaChannelRaw(); source_alpha != nullptr) {
        alpha = TZmBitmap::CreateAsAlphaChannel(width, height, source_alpha->GetLocation());
        if (alpha == nullptr || !Stretch(*source_alpha, *alpha, rfNone)) {
            return false;
        }
        alpha->SyncFull();
    }
    if (!Stretch(*fZmBitmap, pixels, filter)) {
        return false;
    }
    pixels.RemoveAlphaChannel(/*merge=*/false, /*background=*/0);
    fZmBitmap->TakeOver(pixels);
    if (alpha != nullptr) {
        fZmBitmap->ReplaceAlphaChannel(std::move(alpha));
    }
    return true;
}

}  // namespace zm
