// The frame of the processing operations: attachment, consistency, region, begin and end.

#include "engine/proc/zalmoproc.h"

#include <algorithm>
#include <new>
#include <utility>

#include "engine/proc/zmresample_p.h"

namespace zm {
namespace {

constexpr TColor kWhite = 0xFFFFFF;

}  // namespace

TZalmoProc::TZalmoProc(bool has_owner)
    : fAutoUndo(has_owner), fOwnedBitmap(std::make_unique<TZmBitmap>()) {
    fZmBitmap = fOwnedBitmap.get();
}

TZalmoProc::TZalmoProc(TZmBitmap* bitmap) : fZmBitmap(bitmap) {}

TZalmoProc::TZalmoProc(TBitmap* bitmap) : TZalmoProc(/*has_owner=*/false) {
    fBitmap = bitmap;
    fZmBitmap->EncapsulateTBitmap(bitmap, /*do_free_image=*/true);
}

TZalmoProc::~TZalmoProc() = default;

void TZalmoProc::SetAttachedZmBitmap(TZmBitmap* bitmap) {
    if (bitmap == fZmBitmap) {
        return;
    }
    fRegionBitmap.reset();
    fZmBitmap = bitmap;
    fBitmap = nullptr;
    fOwnedBitmap.reset();
}

void TZalmoProc::Update() {
    if (fZmBitmap == nullptr) {
        return;
    }
    if (fBitmap != nullptr) {
        fZmBitmap->RemoveAlphaChannel(/*merge=*/true, kWhite);
    }
    fZmBitmap->Changed();
    if (fBitmap != nullptr) {
        fBitmap->SetModified(true);
    }
}

void TZalmoProc::RequireBitmap() const {
    if (fZmBitmap == nullptr) {
        throw EZmException("Active layer does not contain bitmap");
    }
}

bool TZalmoProc::MakeConsistent(const TZmPixelFormatSet& allowed, bool check_view) {
    if (check_view) {
        RequireBitmap();
    }
    if (fZmBitmap == nullptr) {
        return false;
    }
    if (fBitmap != nullptr) {
        fZmBitmap->EncapsulateTBitmap(fBitmap, /*do_free_image=*/false);
    }
    return fZmBitmap->CheckFormat(allowed, fAutoConvertFormat);
}

// Selection.

void TZalmoProc::Select(const TRect& rect) {
    Deselect();
    fSelectedRect = rect;
    fSelected = true;
}

void TZalmoProc::SelectMask(TZmMask& mask) {
    Deselect();
    if (mask.IsEmpty()) {
        return;
    }
    auto copy = std::make_unique<TZmMask>();
    copy->Assign(mask);
    if (copy->IsEmpty()) {
        throw std::bad_alloc();
    }
    fSelectionMask = std::move(copy);
}

void TZalmoProc::Deselect() {
    fSelected = false;
    fSelectionMask.reset();
}

bool TZalmoProc::GetReSel(std::int32_t& x1, std::int32_t& y1, std::int32_t& x2, std::int32_t& y2,
                          TZmMask*& mask) {
    const std::int32_t width = fZmBitmap != nullptr ? fZmBitmap->GetWidth() : 0;
    const std::int32_t height = fZmBitmap != nullptr ? fZmBitmap->GetHeight() : 0;
    x1 = 0;
    y1 = 0;
    x2 = width;
    y2 = height;
    mask = fSelectionMask.get();
    TRect rect = fSelectedRect;
    if (mask != nullptr) {
        rect = TRect{mask->GetX1(), mask->GetY1(), mask->GetX2() + 1, mask->GetY2() + 1};
    } else if (!fSelected || rect.left >= rect.right || rect.top >= rect.bottom) {
        return false;
    }
    x1 = std::max(rect.left, 0);
    y1 = std::max(rect.top, 0);
    x2 = std::min(rect.right, width);
    y2 = std::min(rect.bottom, height);
    return true;
}

// Begin and end.

/// Copies the region, with its alpha; there is no copy without room or pixels.
void TZalmoProc::CutRegion(std::int32_t& x1, std::int32_t& y1, std::int32_t& x2, std::int32_t& y2) {
    fRegionBitmap.reset();
    auto region = std::make_unique<TZmBitmap>();
    TakePlaceSettings(*fZmBitmap, *region);
    if (x1 >= x2 || y1 >= y2 || !region->Allocate(x2 - x1, y2 - y1, fZmBitmap->GetPixelFormat())) {
        return;
    }
    fZmBitmap->CopyPaletteTo(region.get());
    if (fZmBitmap->HasAlphaChannel() && region->GetAlphaChannel() != nullptr) {
        // All of a full plane's copy is opaque too, and need not be written back.
        region->GetAlphaChannel()->SetFull(true);
    }
    fZmBitmap->CopyRectTo(region.get(), x1, y1, 0, 0, x2 - x1, y2 - y1, /*copy_alpha=*/true);
    x1 = 0;
    y1 = 0;
    x2 = region->GetWidth();
    y2 = region->GetHeight();
    fRegionBitmap = std::move(region);
}

void TZalmoProc::SaveUndoOfOperation(const std::u16string& caption, std::int32_t operation) {
    RequireBitmap();
    if (fAutoUndo) {
        SaveUndo(caption, zmuImage, /*clear_redo=*/true, operation);
    }
}

bool TZalmoProc::BeginImageProcessing(const TZmPixelFormatSet& allowed, std::int32_t& x1,
                                      std::int32_t& y1, std::int32_t& x2, std::int32_t& y2,
                                      const std::u16string& op_name, TZmBitmap*& proc_bitmap,
                                      TZmMask*& mask, std::int32_t operation) {
    SaveUndoOfOperation(op_name, operation);
    return BeginImageAnalysis(allowed, x1, y1, x2, y2, proc_bitmap, mask);
}

bool TZalmoProc::BeginImageProcessing(const TZmPixelFormatSet& allowed, std::int32_t& x1,
                                      std::int32_t& y1, std::int32_t& x2, std::int32_t& y2,
                                      const std::u16string& op_name, TZmBitmap*& proc_bitmap,
                                      std::int32_t operation) {
    SaveUndoOfOperation(op_name, operation);
    fRegionBitmap.reset();
    proc_bitmap = fZmBitmap;
    if (!MakeConsistent(allowed, /*check_view=*/true)) {
        return false;
    }
    TZmMask* mask = nullptr;
    GetReSel(x1, y1, x2, y2, mask);
    return true;
}

void TZalmoProc::EndImageProcessing(TZmBitmap* proc_bitmap, TZmMask* mask) {
    if (fRegionBitmap != nullptr && proc_bitmap == fRegionBitmap.get() && mask != nullptr) {
        const std::int32_t left = mask->GetX1();
        const std::int32_t top = mask->GetY1();
        mask->CopyZmBitmap(fZmBitmap, proc_bitmap, left, top);
        if (proc_bitmap->HasAlphaChannel() && !proc_bitmap->GetAlphaChannelRaw()->GetFull()) {
            mask->CopyZmBitmapAlpha(fZmBitmap, proc_bitmap, left, top);
            fZmBitmap->GetAlphaChannel()->SetFull(false);
        }
    }
    fRegionBitmap.reset();
    Update();
}

bool TZalmoProc::BeginImageAnalysis(const TZmPixelFormatSet& allowed, std::int32_t& x1,
                                    std::int32_t& y1, std::int32_t& x2, std::int32_t& y2,
                                    TZmBitmap*& proc_bitmap, TZmMask*& mask) {
    fRegionBitmap.reset();
    proc_bitmap = fZmBitmap;
    mask = nullptr;
    if (!MakeConsistent(allowed, /*check_view=*/true)) {
        return false;
    }
    GetReSel(x1, y1, x2, y2, mask);
    if (mask == nullptr) {
        return true;
    }
    CutRegion(x1, y1, x2, y2);
    if (fRegionBitmap == nullptr) {
        return false;
    }
    proc_bitmap = fRegionBitmap.get();
    return true;
}

void TZalmoProc::EndImageAnalysis(TZmBitmap* /*proc_bitmap*/) {
    fRegionBitmap.reset();
}

}  // namespace zm
