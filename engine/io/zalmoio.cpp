#include "engine/io/zalmoio.h"

#include <new>

#include "engine/bitmap/zmplatformbitmap.h"
#include "engine/bitmap/zmxBitmaps.h"

// Life of the driver, its notices and threads, and the frame that every load and save runs in.
namespace zm {

TZalmoIO::TZalmoIO() : own_bitmap_(std::make_unique<TZmBitmap>()), fZmBitmap(own_bitmap_.get()) {
    fParams = std::make_unique<TIOParams>(static_cast<TZmParamsOwner*>(this));
}

TZalmoIO::~TZalmoIO() {
    WaitThreads(/*abort_all=*/false);
}

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

/// Layers bring bitmaps of their own.
void TZalmoIO::CheckAttachedBitmap(std::int32_t type) const {
    if (fZmBitmap == nullptr && type != ioLYR) {
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

/// A work that starts while all are to end does not get to work at all.
void TZalmoIO::ClearAborting() {
    fAborting = abort_all_.load();
}

/// The record of one work. Its flag is the work's own; the driver's joins in at each progress
/// step, from whatever thread it was set.
TProgressRec TZalmoIO::MakeProgress(bool& aborting) {
    TProgressRec progress;
    progress.fOnProgress = [this, &aborting](void*, std::int32_t percent) {
        DoIntProgress(percent);
        threads_.PausePoint();
        aborting = aborting || fAborting;
    };
    progress.Sender = this;
    progress.Aborting = &aborting;
    return progress;
}

void TZalmoIO::Notify(const TZmIONotice& notice) {
    if (!threads_.IsOwnThread()) {
        Deliver(notice);
        return;
    }
    notices_.Post(notice);
    if (fOnNoticeQueued) {
        fOnNoticeQueued(this);
    }
}

void TZalmoIO::Deliver(const TZmIONotice& notice) {
    const auto call = [this](const TZmFinishWorkEvent& event) {
        if (event) {
            event(this);
        }
    };
    switch (notice.kind) {
        case kNoticeProgress:
            if (fOnProgress) {
                fOnProgress(this, notice.percent);
            }
            break;
        case kNoticeBitmapChanged:
            if (fZmBitmap != nullptr) {
                fZmBitmap->Changed();
            }
            break;
        case kNoticeImageLoaded: call(fOnImageLoaded); break;
        case kNoticeFinishWork: call(fOnFinishWork); break;
    }
}

std::int32_t TZalmoIO::DrainNotices() {
    std::int32_t count = 0;
    while (const auto notice = notices_.Take()) {
        Deliver(*notice);
        ++count;
    }
    return count;
}

void TZalmoIO::DoIntProgress(std::int32_t percent) {
    Notify({kNoticeProgress, percent});
}

void TZalmoIO::DoFinishWork() {
    DoIntProgress(100);
    Notify({kNoticeFinishWork});
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

bool TZalmoIO::RunToNotice(TAfterWork after, const std::function<void(bool& aborting)>& work) {
    const auto finish = [&] {
        if (after == kAfterLoad) {
            Notify({kNoticeImageLoaded});
        }
        DoFinishWork();
    };
    ClearAborting();
    bool aborting = fAborting;
    try {
        if (!aborting) {
            work(aborting);
        }
    } catch (const std::bad_alloc&) {
        aborting = true;
    } catch (...) {
        fAborting = true;
        finish();
        throw;
    }
    if (aborting) {
        fAborting = true;
    }
    const bool has_worked = !fAborting;
    finish();
    return has_worked;
}

/// Only a borrowed bitmap can be left to a thread: the driver's own may go with the driver.
bool TZalmoIO::StartsThread() const {
    return fAsyncMode && own_bitmap_ == nullptr && in_place_ == 0 && !threads_.IsOwnThread();
}

bool TZalmoIO::RunOrStart(std::function<bool()> work) {
    if (StartsThread()) {
        ClearAborting();
        if (threads_.Start([work] { work(); })) {
            return true;
        }
    }
    return work();
}

void TZalmoIO::WaitThreads(bool abort_all) {
    abort_all_ = abort_all;
    if (abort_all) {
        fAborting = true;
    }
    threads_.Wait();
    abort_all_ = false;
}

std::int32_t TZalmoIO::CountFile(std::int32_t type, const std::u16string& name) {
    const bool starts_thread = StartsThread();
    const bool is_loaded = LoadFileAs(type, name);
    return is_loaded && !starts_thread ? GetParams()->GetImageCount() : -1;
}

std::int32_t TZalmoIO::CountStream(std::int32_t type, TStream& stream) {
    const bool starts_thread = StartsThread();
    const bool is_loaded = LoadStreamAs(type, stream);
    return is_loaded && !starts_thread ? GetParams()->GetImageCount() : -1;
}

}  // namespace zm
