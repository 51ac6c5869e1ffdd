#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

/// Fork-join of work objects: a fixed set is started, then the caller waits for all.
namespace zm {

class TZmExecutorThread;

/// One piece of work. A descendant overrides Execute and stores its inputs and outputs. An
/// exception that leaves Execute on a thread is kept and raised again by WaitFor or Join of the
/// pool, after all members have ended.
class TZmExecutor {
public:
    /// With `exec_in_thread` the work gets a thread of its own, started by TZmThreadPool::Add.
    explicit TZmExecutor(bool exec_in_thread);
    virtual ~TZmExecutor();
    TZmExecutor(const TZmExecutor&) = delete;
    TZmExecutor& operator=(const TZmExecutor&) = delete;
    virtual void Execute() = 0;
    /// The thread, or nil when the work runs on the caller's.
    TZmExecutorThread* GetThread() const { return fThread.get(); }

private:
    std::unique_ptr<TZmExecutorThread> fThread;
};

/// Owns its members. Destruction joins.
class TZmThreadPool {
public:
    TZmThreadPool();
    ~TZmThreadPool();
    TZmThreadPool(const TZmThreadPool&) = delete;
    TZmThreadPool& operator=(const TZmThreadPool&) = delete;
    /// Adds and starts a member: on its thread, or at once on the calling thread when it has
    /// none, and then Add returns when the work has ended.
    void Add(std::unique_ptr<TZmExecutor> executor);
    /// Waits for every member that has a thread; members stay.
    void WaitFor();
    /// Waits for the members in order, frees each, and empties the list.
    void Join();
    /// The member, or nil for an index outside.
    TZmExecutor* GetThreads(std::size_t index) const {
        return index < fThreads.size() ? fThreads[index].get() : nullptr;
    }
    std::size_t GetCount() const { return fThreads.size(); }

private:
    std::vector<std::unique_ptr<TZmExecutor>> fThreads;
};

/// Workers for an image: 1 when width times height, as a 32-bit signed product, is below
/// `fImageProcThreadsMinSize`, else the smaller of `fImageProcMaxThreads` and the core count.
std::int32_t ZmThreadsForSize(std::int32_t width, std::int32_t height);

/// Physical cores; found once and cached in `fDefaultCoresCount` of the settings.
std::int32_t ZmCoreCount();

}  // namespace zm
