#include "engine/foundation/zmutils_threadpool.h"

#include <algorithm>
#include <atomic>
#include <exception>
#include <system_error>
#include <thread>
#include <utility>

#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "engine/platform/memory.h"

namespace zm {

/// A thread that is bound to one piece of work and starts later.
class TZmExecutorThread {
public:
    explicit TZmExecutorThread(std::function<void()> exec_func) : fExecFunc(std::move(exec_func)) {}
    ~TZmExecutorThread() { WaitFor(); }
    TZmExecutorThread(const TZmExecutorThread&) = delete;
    TZmExecutorThread& operator=(const TZmExecutorThread&) = delete;

    void Start() {
        try {
            thread_ = std::thread([this] { Run(); });
        } catch (const std::system_error&) {
            Run();  // the system has no thread left; the caller's does the work
        }
    }
    void WaitFor() {
        if (thread_.joinable()) {
            thread_.join();
        }
    }
    /// The exception that ended the work, once; nil without one.
    std::exception_ptr TakeFailure() { return std::exchange(failure_, nullptr); }

private:
    void Run() {
        try {
            fExecFunc();
        } catch (...) {
            failure_ = std::current_exception();
        }
    }

    std::function<void()> fExecFunc;
    std::thread thread_;
    std::exception_ptr failure_;
};

namespace {

/// Waits for a member; `failure` takes its exception unless it holds one.
void WaitForMember(const TZmExecutor& executor, std::exception_ptr& failure) {
    TZmExecutorThread* const thread = executor.GetThread();
    if (thread == nullptr) {
        return;
    }
    thread->WaitFor();
    const std::exception_ptr own_failure = thread->TakeFailure();
    if (failure == nullptr) {
        failure = own_failure;
    }
}

void RaiseAgain(const std::exception_ptr& failure) {
    if (failure != nullptr) {
        std::rethrow_exception(failure);
    }
}

}  // namespace

TZmExecutor::TZmExecutor(bool exec_in_thread) {
    if (exec_in_thread) {
        fThread = std::make_unique<TZmExecutorThread>([this] { Execute(); });
    }
}

TZmExecutor::~TZmExecutor() = default;

TZmThreadPool::TZmThreadPool() = default;

TZmThreadPool::~TZmThreadPool() {
    for (auto& executor : fThreads) {
        std::exception_ptr unheard;  // nobody asked, and a destructor cannot tell
        WaitForMember(*executor, unheard);
        executor.reset();
    }
}

void TZmThreadPool::Add(std::unique_ptr<TZmExecutor> executor) {
    fThreads.push_back(std::move(executor));
    TZmExecutor& added = *fThreads.back();
    if (added.GetThread() == nullptr) {
        added.Execute();
    } else {
        added.GetThread()->Start();
    }
}

void TZmThreadPool::WaitFor() {
    std::exception_ptr failure;
    for (const auto& executor : fThreads) {
        WaitForMember(*executor, failure);
    }
    RaiseAgain(failure);
}

void TZmThreadPool::Join() {
    std::exception_ptr failure;
    for (auto& executor : fThreads) {
        WaitForMember(*executor, failure);
        executor.reset();
    }
    fThreads.clear();
    RaiseAgain(failure);
}

std::int32_t ZmThreadsForSize(std::int32_t width, std::int32_t height) {
    const TZmZalmoGlobalSettings& settings = ZmGlobalSettings();
    // Required: the product wraps at 32 bits, so very large images may count as small ones.
    if (WrapMul32(width, height) < settings.fImageProcThreadsMinSize) {
        return 1;
    }
    return std::min(settings.fImageProcMaxThreads, ZmCoreCount());
}

std::int32_t ZmCoreCount() {
    // Jobs on several threads may be the first to ask, all of them with the same answer.
    const std::atomic_ref<std::int32_t> cached(ZmGlobalSettings().fDefaultCoresCount);
    std::int32_t count = cached.load(std::memory_order_relaxed);
    if (count == -1) {
        count = platform::PhysicalCoreCount();
        cached.store(count, std::memory_order_relaxed);
    }
    return count;
}

}  // namespace zm
