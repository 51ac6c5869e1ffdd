#pragma once

#include <condition_variable>
#include <cstdint>
#include <deque>
#include <functional>
#include <list>
#include <mutex>
#include <optional>
#include <thread>

/// What lets a driver work on threads of its own.
namespace zm {

/// What a driver tells its owner. Told directly on the owner's thread; from a thread of the
/// driver's own through a queue that the owner drains.
enum TZmIONoticeKind : std::uint8_t {
    kNoticeProgress,
    kNoticeBitmapChanged,
    kNoticeImageLoaded,
    kNoticeFinishWork,
};

struct TZmIONotice {
    TZmIONoticeKind kind = kNoticeProgress;
    std::int32_t percent = 0;  ///< of kNoticeProgress
};

/// First in, first out; any threads.
class TZmIONoticeQueue {
public:
    void Post(const TZmIONotice& notice);
    std::optional<TZmIONotice> Take();

private:
    std::mutex mutex_;
    std::deque<TZmIONotice> notices_;
};

/// One thread of a driver: runs its work and ends.
struct TZmIOThread {
    std::thread thread;
    bool is_paused = false;
    bool is_done = false;
};

/// The threads of one driver. They are never stopped from outside: a pause takes hold, and an
/// abort is seen, where the work itself asks (at each progress step).
class TZmIOThreads {
public:
    TZmIOThreads() = default;
    /// Resumes and waits.
    ~TZmIOThreads();
    TZmIOThreads(const TZmIOThreads&) = delete;
    TZmIOThreads& operator=(const TZmIOThreads&) = delete;

    /// Runs `work` on a new thread; what it raises ends with the thread. False, and nothing is
    /// run, when the system has no thread to give.
    bool Start(std::function<void()> work);
    /// Whether the caller is one of these threads.
    bool IsOwnThread() const;
    /// Threads that have not ended.
    std::int32_t Count() const;
    /// Returns when none is left. Paused threads are resumed, as they would never end. On one of
    /// these threads it does nothing.
    void Wait();
    /// Returns when every thread is paused or has ended; later ones pause at their first step.
    void Suspend();
    void Resume();
    /// Called by the work: blocks one of these threads while they are suspended.
    void PausePoint();

private:
    void Run(TZmIOThread& self, const std::function<void()>& work);
    void JoinDone();
    bool AllPausedOrDone(std::thread::id except) const;
    TZmIOThread* Find(std::thread::id id);

    mutable std::mutex fAsyncThreadsCS;
    std::condition_variable fAsyncThreadsFinishEvent;  // a thread ended, paused or may go on
    std::list<TZmIOThread> fAsyncThreads;
    bool is_suspended_ = false;
};

}  // namespace zm
