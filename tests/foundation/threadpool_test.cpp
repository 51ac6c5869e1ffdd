#include "engine/foundation/zmutils_threadpool.h"

#include <gtest/gtest.h>

#include <atomic>
#include <stdexcept>
#include <string>
#include <thread>

#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"
#include "tests/support/testmessage.h"

namespace zm {
namespace {

class TWork : public TZmExecutor {
public:
    TWork(bool exec_in_thread, std::function<void()> work, std::string* freed = nullptr,
          char name = ' ')
        : TZmExecutor(exec_in_thread), work_(std::move(work)), freed_(freed), name_(name) {}
    ~TWork() override {
        if (freed_ != nullptr) {
            *freed_ += name_;
        }
    }
    void Execute() override { work_(); }

private:
    std::function<void()> work_;
    std::string* freed_;
    char name_;
};

/// Settings as they are at the start, whatever a test changes.
class ThreadsForSize : public testing::Test {
protected:
    void SetUp() override { DestroySingletonInstance(); }
    void TearDown() override { DestroySingletonInstance(); }
};

TEST(ThreadPool, WorkWithoutAThreadIsDoneWhenAddReturns) {
    TZmThreadPool pool;
    std::thread::id ran_on;
    pool.Add(std::make_unique<TWork>(false, [&] { ran_on = std::this_thread::get_id(); }));
    EXPECT_EQ(ran_on, std::this_thread::get_id());
    EXPECT_EQ(pool.GetThreads(0)->GetThread(), nullptr);
    pool.Join();
    EXPECT_EQ(pool.GetCount(), 0u);
}

TEST(ThreadPool, MembersRunAtTheSameTimeAndStayAfterWaitFor) {
    TZmThreadPool pool;
    std::atomic<int> arrived{0};
    for (int i = 0; i < 3; ++i) {
        pool.Add(std::make_unique<TWork>(true, [&] {
            ++arrived;
            while (arrived < 3) {  // none can end before all have begun
                std::this_thread::yield();
            }
        }));
    }
    pool.WaitFor();
    EXPECT_EQ(arrived, 3);
    EXPECT_EQ(pool.GetCount(), 3u);
}

TEST(ThreadPool, JoinFreesInListOrderAlsoWhenItRaises) {
    std::string freed;
    TZmThreadPool pool;
    for (const char name : std::string("abc")) {
        pool.Add(std::make_unique<TWork>(
            name != 'b', [name] { name == 'a' ? throw std::out_of_range("x") : void(); }, &freed,
            name));
    }
    EXPECT_THROW(pool.Join(), std::out_of_range);
    EXPECT_EQ(freed, "abc");
    EXPECT_EQ(pool.GetCount(), 0u);
}

TEST(ThreadPool, DestructionWaitsForTheWork) {
    std::atomic<bool> ended{false};
    {
        TZmThreadPool pool;
        pool.Add(std::make_unique<TWork>(true, [&] {
            std::this_thread::sleep_for(std::chrono::milliseconds(20));
            ended = true;
            throw std::runtime_error("nobody hears this");
        }));
    }
    EXPECT_TRUE(ended);
}

TEST(ThreadPool, TheFirstExceptionComesOutAfterAllHaveEnded) {
    TZmThreadPool pool;
    std::atomic<bool> last_ended{false};
    const auto fail = [](const char* text) { throw std::runtime_error(text); };
    pool.Add(std::make_unique<TWork>(true, [&] { fail("first"); }));
    pool.Add(std::make_unique<TWork>(true, [&] { fail("second"); }));
    pool.Add(std::make_unique<TWork>(true, [&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        last_ended = true;
    }));
    EXPECT_EQ(test::MessageOf([&] { pool.WaitFor(); }), "first");
    EXPECT_TRUE(last_ended);
    EXPECT_NO_THROW(pool.Join()) << "an exception is raised once";
    EXPECT_EQ(pool.GetCount(), 0u);
}

TEST_F(ThreadsForSize, FollowsPixelsLimitAndCores) {
    const struct {
        std::int32_t width;
        std::int32_t height;
        std::int32_t cores;
        std::int32_t threads;
    } rows[] = {
        {1000, 1000, 4, 4},   {255, 255, 4, 1},  // 65025 pixels
        {256, 256, 4, 4},                        // 65536 pixels: the limit itself counts as large
        {1000, 1000, 2, 2},   {1000, 1000, 64, 4},
        {65536, 32768, 4, 1},  // the product wraps to the smallest number
        {65536, 65536, 4, 1},  // the product wraps to 0
        {65536, 65537, 4, 4},  // the product wraps to 65536
        {0, 0, 4, 1},
    };
    for (const auto& row : rows) {
        ZmGlobalSettings().fDefaultCoresCount = row.cores;
        EXPECT_EQ(ZmThreadsForSize(row.width, row.height), row.threads)
            << row.width << " x " << row.height << " on " << row.cores;
    }
    ZmGlobalSettings().fImageProcThreadsMinSize = std::int64_t{1} << 40;
    EXPECT_EQ(ZmThreadsForSize(46340, 46340), 1);
}

TEST_F(ThreadsForSize, CoresAreCountedOnceAndRemembered) {
    EXPECT_EQ(ZmGlobalSettings().fDefaultCoresCount, -1);
    const std::int32_t cores = ZmCoreCount();
    EXPECT_GE(cores, 1);
    EXPECT_EQ(ZmGlobalSettings().fDefaultCoresCount, cores);
    ZmGlobalSettings().fDefaultCoresCount = 77;
    EXPECT_EQ(ZmCoreCount(), 77);
}

}  // namespace
}  // namespace zm
