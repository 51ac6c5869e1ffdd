// The frame of the processing operations: attachment, consistency, region, begin and end.

#include "engine/proc/zalmoproc.h"

#include <algorithm>

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

void TZalmoProc::Select(const TRect& rect) {
    fSelectedRect = rect;
    fSelected = true;
}

bool TZalmoProc::GetReSel(std::int32_t& x1, std::int32_t& y1, std::int32_t& x2,
                          std::int32_t& y2) {
    const std::int32_t width = fZmBitmap != nullptr ? fZmBitmap->GetWidth() : 0;
    const std::int32_t height = fZmBitmap != nullptr ? fZmBitmap->GetHeight() : 0;
    x1 = 0;
    y1 = 0;
    x2 = width;
    y2 = height;
    if (!fSelected || fSelectedRect.left >= fSelectedRect.right ||
        fSelectedRect.top >= fSelectedRect.bottom) {
        return false;
    }
    x1 = std::max(fSelectedRect.left, 0);
    y1 = std::max(fSelectedRect.top, 0);
    x2 = std::min(fSelectedRect.right, width);
    y2 = std::min(fSelectedRect.bottom, height);
    return true;
}

bool TZalmoProc::BeginImageProcessing(const TZmPixelFormatSet& allowed, std::int32_t& x1,
                                      std::int32_t& y1, std::int32_t& x2, std::int32_t& y2,
                                      const std::u16string& op_name, TZmBitmap*& proc_bitmap,
                                      std::int32_t operation) {
    RequireBitmap();
    if (fAutoUndo) {
        SaveUndo(op_name, zmuImage, /*clear_redo=*/true, operation);
    }
    return BeginImageAnalysis(allowed, x1, y1, x2, y2, proc_bitmap);
}

/// There is no temporary to write back without a selection mask: `proc_bitmap` is the attached
/// bitmap itself.
void TZalmoProc::EndImageProcessing(TZmBitmap* /*proc_bitmap*/) {
    Update();
}

bool TZalmoProc::BeginImageAnalysis(const TZmPixelFormatSet& allowed, std::int32_t& x1,
                                    std::int32_t& y1, std::int32_t& x2, std::int32_t& y2,
                                    TZmBitmap*& proc_bitmap) {
    if (!MakeConsistent(allowed, /*check_view=*/true)) {
        return false;
    }
    GetReSel(x1, y1, x2, y2);
    proc_bitmap = fZmBitmap;
    return true;
}

void TZalmoProc::EndImageAnalysis(TZmBitmap* /*proc_bitmap*/) {}

}  // namespace zm
