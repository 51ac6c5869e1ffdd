#include "engine/io/zalmoio.h"

#include <new>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"

// Life of the driver, its notices, and the frame that every load and save runs in.
namespace zm {

TZalmoIO::TZalmoIO() : own_bitmap_(std::make_unique<TZmBitmap>()), fZmBitmap(own_bitmap_.get()) {
    fParams = std::make_unique<TIOParams>(static_cast<TZmParamsOwner*>(this));
}

TZalmoIO::~TZalmoIO() = default;

std::unique_ptr<TZalmoIO> TZalmoIO::CreateFromBitmap(TZmBitmap* bitmap) {
    auto driver = std::make_unique<TZalmoIO>();
    driver->AttachZmBitmap(bitmap);
    return driver;
}

std::unique_ptr<TZalmoIO> TZalmoIO::CreateFromBitmap(TBitmap* bitmap) {
    auto driver = std::make_unique<TZalmoIO>();
    driver->AttachTBitmap(bitmap);
    return driver;
}

TIOParams* TZalmoIO::GetParams() const {
    if (fZmBitmap != nullptr && fZmBitmap->GetParams() != nullptr) {
        return fZmBitmap->GetParams();
    }
    return fParams.get();
}

void TZalmoIO::AttachZmBitmap(TZmBitmap* bitmap) {
    fBitmap = nullptr;
    fZmBitmap = bitmap;
    own_bitmap_.reset();
}

void TZalmoIO::AttachTBitmap(TBitmap* bitmap) {
    own_bitmap_ = std::make_unique<TZmBitmap>();
    fZmBitmap = own_bitmap_.get();
    fBitmap = bitmap;
    PrepareBitmap();
}

void TZalmoIO::CheckAttachedBitmap() const {
    if (fZmBitmap == nullptr) {
        throw EZmException("Active layer does not contain bitmap");
    }
}

bool TZalmoIO::PrepareBitmap() {
    if (fZmBitmap == nullptr) {
        return false;
    }
    if (fBitmap != nullptr) {
        fZmBitmap->EncapsulateTBitmap(fBitmap, /*do_free_image=*/true);
    }
    return true;
}

void TZalmoIO::Update() {
    constexpr TColor kWhite = 0xFFFFFF;
    if (fBitmap != nullptr) {
        fZmBitmap->RemoveAlphaChannel(/*merge=*/true, kWhite);
        fBitmap->SetModified(true);
    }
}

TProgressRec TZalmoIO::MakeProgress() {
    TProgressRec progress;
    progress.fOnProgress = [this](void*, std::int32_t percent) { DoIntProgress(percent); };
    progress.Sender = this;
    progress.Aborting = &fAborting;
    return progress;
}

void TZalmoIO::DoIntProgress(std::int32_t percent) {
    if (fOnProgress) {
        fOnProgress(this, percent);
    }
}

void TZalmoIO::DoFinishWork() {
    DoIntProgress(100);
    if (fOnFinishWork) {
        fOnFinishWork(this);
    }
}

bool TZalmoIO::Fail() {
    fAborting = true;
    return false;
}

bool TZalmoIO::FailWithNotice() {
    fAborting = true;
    DoFinishWork();
    return false;
}

bool TZalmoIO::RunToNotice(const std::function<void()>& work) {
    try {
        work();
    } catch (const std::bad_alloc&) {
        fAborting = true;
    } catch (...) {
        FailWithNotice();
        throw;
    }
    DoFinishWork();
    return !fAborting;
}

}  // namespace zm
