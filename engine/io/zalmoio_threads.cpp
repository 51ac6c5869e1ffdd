#include "engine/io/zalmoio_threads.h"

#include <algorithm>
#include <exception>
#include <utility>

namespace zm {

void TZmIONoticeQueue::Post(const TZmIONotice& notice) {
    const std::lock_guard lock(mutex_);
    notices_.push_back(notice);
}

std::optional<TZmIONotice> TZmIONoticeQueue::Take() {
    const std::lock_guard lock(mutex_);
    if (notices_.empty()) {
        return std::nullopt;
    }
    const TZmIONotice notice = notices_.front();
    notices_.pop_front();
    return notice;
}

TZmIOThreads::~TZmIOThreads() {
    Wait();
}

bool TZmIOThreads::Start(std::function<void()> work) {
    const std::lock_guard lock(fAsyncThreadsCS);
    JoinDone();
    TZmIOThread& self = fAsyncThreads.emplace_back();
    try {
        self.thread = std::thread([this, &self, task = std::move(work)] { Run(self, task); });
    } catch (const std::exception&) {  // no thread, or no memory for one
        fAsyncThreads.pop_back();
        return false;
    }
    return true;
}

void TZmIOThreads::Run(TZmIOThread& self, const std::function<void()>& work) {
    try {
        work();
    } catch (...) {
        // The driver has set its flag and run its finish notice; nobody is left to catch.
    }
    const std::lock_guard lock(fAsyncThreadsCS);
    self.is_done = true;
    fAsyncThreadsFinishEvent.notify_all();
}

/// The lock is held. A thread that is done needs it no more.
void TZmIOThreads::JoinDone() {
    fAsyncThreads.remove_if([](TZmIOThread& entry) {
        if (entry.is_done) {
            entry.thread.join();
        }
        return entry.is_done;
    });
}

TZmIOThread* TZmIOThreads::Find(std::thread::id id) {
    const auto found =
        std::find_if(fAsyncThreads.begin(), fAsyncThreads.end(),
                     [id](const TZmIOThread& entry) { return entry.thread.get_id() == id; });
    return found == fAsyncThreads.end() ? nullptr : &*found;
}

bool TZmIOThreads::IsOwnThread() const {
    const std::lock_guard lock(fAsyncThreadsCS);
    return std::any_of(fAsyncThreads.begin(), fAsyncThreads.end(), [](const TZmIOThread& entry) {
        return entry.thread.get_id() == std::this_thread::get_id();
    });
}

std::int32_t TZmIOThreads::Count() const {
    const std::lock_guard lock(fAsyncThreadsCS);
    return static_cast<std::int32_t>(
        std::count_if(fAsyncThreads.begin(), fAsyncThreads.end(),
                      [](const TZmIOThread& entry) { return !entry.is_done; }));
}

void TZmIOThreads::Wait() {
    if (IsOwnThread()) {
        return;
    }
    Resume();
    std::unique_lock lock(fAsyncThreadsCS);
    fAsyncThreadsFinishEvent.wait(lock, [this] {
        return std::all_of(fAsyncThreads.begin(), fAsyncThreads.end(),
                           [](const TZmIOThread& entry) { return entry.is_done; });
    });
    JoinDone();
}

bool TZmIOThreads::AllPausedOrDone(std::thread::id except) const {
    return std::all_of(fAsyncThreads.begin(), fAsyncThreads.end(), [&](const TZmIOThread& entry) {
        return entry.is_paused || entry.is_done || entry.thread.get_id() == except;
    });
}

void TZmIOThreads::Suspend() {
    std::unique_lock lock(fAsyncThreadsCS);
    is_suspended_ = true;
    // Another thread may resume them while this one still waits.
    fAsyncThreadsFinishEvent.wait(lock, [this, self = std::this_thread::get_id()] {
        return !is_suspended_ || AllPausedOrDone(self);
    });
}

void TZmIOThreads::Resume() {
    const std::lock_guard lock(fAsyncThreadsCS);
    is_suspended_ = false;
    fAsyncThreadsFinishEvent.notify_all();
}

void TZmIOThreads::PausePoint() {
    std::unique_lock lock(fAsyncThreadsCS);
    TZmIOThread* self = is_suspended_ ? Find(std::this_thread::get_id()) : nullptr;
    if (self == nullptr) {
        return;
    }
    self->is_paused = true;
    fAsyncThreadsFinishEvent.notify_all();
    fAsyncThreadsFinishEvent.wait(lock, [this] { return !is_suspended_; });
    self->is_paused = false;
}

}  // namespace zm
