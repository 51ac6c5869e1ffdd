// Resample and ResampleTo of the processor, and the forms of TZmBitmap without one.

#include <utility>

#include "engine/foundation/zmnumbers.h"
#include "engine/proc/zalmoproc.h"
#include "engine/proc/zmresample.h"
#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

/// Makes room for a resized image in the format of the source. A target that held an image
/// before does not keep a plane that the source does not have.
bool PrepareTarget(TZmBitmap& source, TZmBitmap& target, TZmImageSize size) {
    if (size.width < 1 || size.height < 1 ||
        !target.Allocate(size.width, size.height, source.GetPixelFormat())) {
        return false;
    }
    if (!source.HasAlphaChannel()) {
        target.RemoveAlphaChannel(/*merge=*/false, 0);
    }
    return true;
}

}  // namespace

void TakePlaceSettings(TZmBitmap& owner, TZmBitmap& result) {
    if (owner.GetLocation() != zmTBitmap) {
        result.SetLocation(owner.GetLocation());
    }
    result.SetMinFileSize(owner.GetMinFileSize());
    result.SetBitAlignment(owner.GetBitAlignment());
    result.SetMemoryAllocator(owner.GetMemoryAllocator());
}

void TZmBitmap::TakeOver(TZmBitmap& source) {
    if (GetLocation() == zmTBitmap) {
        AssignEx(&source, /*with_params=*/false);
        source.Clear();
        return;
    }
    const bool is_alpha = fIsAlpha;
    const bool modified = fModified;
    const TZmDitherMethod dither_method = fDefaultDitherMethod;
    TZmNotifyEvent on_changed = std::move(fOnChanged);
    TZmBitmapProgressEvent on_progress = std::move(fOnProgress);
    fOnChanged = nullptr;
    fOnProgress = nullptr;
    source.SwitchTo(this);
    fIsAlpha = is_alpha;
    fModified = modified;
    fDefaultDitherMethod = dither_method;
    fOnChanged = std::move(on_changed);
    fOnProgress = std::move(on_progress);
    Changed();
}

void TZmBitmap::Resample(std::int32_t new_width, std::int32_t new_height, TResampleFilter filter,
                         bool maintain_aspect_ratio, bool shrink_only) {
    const TZmImageSize size =
        CalcResampleSize(new_width, new_height, GetWidth(), GetHeight(), maintain_aspect_ratio);
    if (IsEmpty() || size.width < 1 || size.height < 1) {
        return;
    }
    const bool same = size.width == GetWidth() && size.height == GetHeight();
    const bool would_grow = GetWidth() <= size.width || GetHeight() <= size.height;
    if (same || (shrink_only && would_grow)) {
        Changed();
        return;
    }
    TZmBitmap result;
    TakePlaceSettings(*this, result);
    if (PrepareTarget(*this, result, size) &&
        ResampleBitmapInto(*this, result, filter, this, fOnProgress)) {
        TakeOver(result);
    }
}

void TZmBitmap::Resample(double scale_by, TResampleFilter filter) {
    if (!IsEmpty() && scale_by > 0) {
        Resample(RoundHalfEven(GetWidth() * scale_by), RoundHalfEven(GetHeight() * scale_by),
                 filter, /*maintain_aspect_ratio=*/false, /*shrink_only=*/false);
    }
}

void TZalmoProc::Resample(std::int32_t new_width, std::int32_t new_height, TResampleFilter filter,
                          bool maintain_aspect_ratio) {
    if (!MakeConsistent(TZmPixelFormatSet(), /*check_view=*/false) || fZmBitmap->IsEmpty()) {
        return;
    }
    TZmBitmap& image = *fZmBitmap;
    // Compared before the sizing rule: a request of -1, 0 or an aspect-corrected size runs, and
    // saves undo, even where it changes nothing.
    if (new_width == image.GetWidth() && new_height == image.GetHeight()) {
        return;
    }
    const TZmImageSize size = CalcResampleSize(new_width, new_height, image.GetWidth(),
                                               image.GetHeight(), maintain_aspect_ratio);
    TZmBitmap result;
    TakePlaceSettings(image, result);
    if (!PrepareTarget(image, result, size)) {
        return;
    }
    if (fAutoUndo) {
        SaveUndo(OperationCaption(kOperationResample), zmuImage, /*clear_redo=*/true,
                 kOperationResample);
    }
    if (!ResampleBitmapInto(image, result, filter, this, fOnProgress)) {
        return;
    }
    image.TakeOver(result);
    Update();
    if (fOnFinishWork) {
        fOnFinishWork(this);
    }
}

void TZalmoProc::Resample(double scale_by, TResampleFilter filter) {
    if (fZmBitmap != nullptr && !fZmBitmap->IsEmpty() && scale_by > 0) {
        Resample(RoundHalfEven(fZmBitmap->GetWidth() * scale_by),
                 RoundHalfEven(fZmBitmap->GetHeight() * scale_by), filter,
                 /*maintain_aspect_ratio=*/false);
    }
}

void TZalmoProc::ResampleTo(TZmBitmap* target, std::int32_t new_width, std::int32_t new_height,
                            TResampleFilter filter, bool maintain_aspect_ratio) {
    if (target == nullptr || target == fZmBitmap ||
        !MakeConsistent(TZmPixelFormatSet(), /*check_view=*/false) || fZmBitmap->IsEmpty()) {
        return;
    }
    const TZmImageSize size = CalcResampleSize(new_width, new_height, fZmBitmap->GetWidth(),
                                               fZmBitmap->GetHeight(), maintain_aspect_ratio);
    if (PrepareTarget(*fZmBitmap, *target, size) &&
        !ResampleBitmapInto(*fZmBitmap, *target, filter, this, fOnProgress)) {
        target->FreeImage(/*free_alpha=*/true);
    }
}

}  // namespace zm
