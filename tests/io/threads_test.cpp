#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include "tests/io/driverfixture.h"

// Loads and saves on the driver's own threads, and drivers on many threads at once.
namespace zm {
namespace {

using std::chrono::milliseconds;

constexpr std::int32_t kSlowType = 9002;

std::atomic<int> g_steps{0};
std::atomic<int> g_step_limit{0};

/// Works until it is stopped or has done g_step_limit steps.
void ReadSlowly(TStream&, TZmBitmap& bitmap, TIOParams&, TProgressRec& progress, bool) {
    bool is_going_on = bitmap.Allocate(1, 1, zm8g);
    progress.per1 = 1;
    for (int step = 1; is_going_on && step <= g_step_limit; ++step) {
        ++g_steps;
        is_going_on = StepProgress(progress, step % 100);
        std::this_thread::sleep_for(milliseconds(1));
    }
}

class Threads : public ::testing::Test {
protected:
    void SetUp() override {
        ZmGlobalSettings();
        test::RegisterRow(kSlowType, "SLOW", ReadSlowly);
        test::WriteFileBytes(folder_.File("a.slow"), {1});
        g_steps = 0;
        g_step_limit = 1000000;
        image_ = test::MakeGradient(zm24RGB, 40, 30);
        io_ = TZalmoIO::CreateFromBitmap(image_.get());
        io_->SetAsyncMode(true);
    }
    void TearDown() override {
        io_.reset();
        DestroySingletonInstance();
    }
    bool StartSlow() { return io_->LoadFromFile(folder_.Name("a.slow"), std::int32_t{kSlowType}); }
    static void WaitForSteps(int count) {
        while (g_steps < count) {
            std::this_thread::sleep_for(milliseconds(1));
        }
    }

    test::TempFolder folder_;
    std::unique_ptr<TZmBitmap> image_;
    std::unique_ptr<TZalmoIO> io_;
};

TEST_F(Threads, NoticesReachTheOwnerInOrderWhenItDrainsThem) {
    const std::thread::id owner = std::this_thread::get_id();
    std::vector<std::string> order;
    const auto note = [&](const std::string& what) {
        EXPECT_EQ(owner, std::this_thread::get_id());
        order.push_back(what);
    };
    std::atomic<int> queued{0};
    io_->SetOnProgress([&](void*, std::int32_t percent) { note(std::to_string(percent)); });
    io_->SetOnImageLoaded([&](void*) { note("loaded"); });
    io_->SetOnFinishWork([&](void*) { note("finished"); });
    io_->SetOnNoticeQueued([&](void*) { ++queued; });
    image_->SetOnChanged([&](void*) {
        // A bitmap tells of its own new pixels where they come; the driver's notice is queued.
        if (owner == std::this_thread::get_id()) {
            note("changed");
        }
    });
    TZmBitmap original(*image_);

    ASSERT_TRUE(io_->SaveToFileBMP(folder_.Name("a.bmp")));
    io_->WaitThreads(/*abort_all=*/false);
    EXPECT_TRUE(order.empty());
    EXPECT_EQ(queued, io_->DrainNotices());
    ASSERT_GT(order.size(), 10u);
    EXPECT_EQ("finished", order.back());
    EXPECT_EQ("100", order[order.size() - 2]);

    order.clear();
    ASSERT_TRUE(image_->Crop(0, 0, 1, 1, kCropNoFill));
    order.clear();
    EXPECT_TRUE(io_->LoadFromFileBMP(folder_.Name("a.bmp")));
    io_->WaitThreads(false);
    io_->DrainNotices();
    EXPECT_EQ(0, io_->DrainNotices());
    EXPECT_FALSE(io_->GetAborting());
    test::ExpectSamePixels(original, *image_);
    ASSERT_GT(order.size(), 5u);
    const std::vector<std::string> tail(order.end() - 4, order.end());
    EXPECT_EQ((std::vector<std::string>{"changed", "loaded", "100", "finished"}), tail);
    for (std::size_t i = 1; i + 4 < order.size(); ++i) {
        EXPECT_LT(std::stoi(order[i - 1]), std::stoi(order[i]));
    }
}

TEST_F(Threads, AWorkIsStoppedFromOutside) {
    EXPECT_TRUE(StartSlow());
    WaitForSteps(3);
    EXPECT_EQ(1, io_->GetThreadsCount());
    io_->SetAborting(true);
    io_->WaitThreads(/*abort_all=*/false);
    EXPECT_TRUE(io_->GetAborting());

    EXPECT_TRUE(StartSlow());
    io_->WaitThreads(/*abort_all=*/true);
    EXPECT_EQ(0, io_->GetThreadsCount());
    EXPECT_TRUE(io_->GetAborting());
    g_step_limit = 3;
    EXPECT_TRUE(StartSlow());
    io_->WaitThreads(false);
    EXPECT_FALSE(io_->GetAborting());
    io_->WaitThreads(/*abort_all=*/true);  // also where no work is left
    EXPECT_TRUE(io_->GetAborting());
}

TEST_F(Threads, SuspendedThreadsStandStill) {
    EXPECT_TRUE(StartSlow());
    WaitForSteps(3);
    io_->SuspendThreads();
    const int steps = g_steps;
    std::this_thread::sleep_for(milliseconds(30));
    EXPECT_EQ(steps, g_steps);
    EXPECT_EQ(1, io_->GetThreadsCount());
    io_->ResumeThreads();
    WaitForSteps(steps + 3);
    io_->SuspendThreads();
    g_step_limit = 1;
    io_->WaitThreads(false);  // resumes them
    EXPECT_EQ(0, io_->GetThreadsCount());
    io_->SuspendThreads();  // nobody there
    io_->ResumeThreads();
}

TEST_F(Threads, TheDriversEndWaits) {
    g_step_limit = 20;
    EXPECT_TRUE(StartSlow());
    WaitForSteps(1);
    io_->SuspendThreads();
    io_.reset();
    EXPECT_EQ(20, g_steps);
}

TEST_F(Threads, WhatRaisesOnAThreadEndsThere) {
    EXPECT_TRUE(io_->LoadFromFileBMP(folder_.Name("none.bmp")));
    io_->WaitThreads(false);
    EXPECT_TRUE(io_->GetAborting());
    EXPECT_TRUE(io_->SaveToFilePNG(folder_.Name("none/a.png")));
    io_->WaitThreads(false);
    EXPECT_TRUE(io_->GetAborting());
}

TEST_F(Threads, CountsAreToldAtOnceAsMinusOne) {
    EXPECT_EQ(-1, io_->LoadFromFileGIF(folder_.Name("a.slow")));
    io_->WaitThreads(false);
}

TEST_F(Threads, AnOwnBitmapAndMemoryStayOnTheCallersThread) {
    TMemoryStream png;
    const auto plain = TZalmoIO::CreateFromBitmap(image_.get());
    ASSERT_TRUE(plain->SaveToStreamPNG(png));
    TZalmoIO own;
    own.SetAsyncMode(true);
    png.SetPosition(0);
    EXPECT_TRUE(own.LoadFromStreamPNG(png));
    EXPECT_EQ(40, own.GetZmBitmap()->GetWidth());
    int finished = 0;
    io_->SetOnFinishWork([&](void*) { ++finished; });
    EXPECT_TRUE(io_->LoadFromBuffer(png.Bytes().data(), png.GetSize(), 0));
    EXPECT_EQ(1, finished);
    EXPECT_EQ(0, io_->GetThreadsCount());
}

void SaveAndLoad(const test::TempFolder& folder, int number) {
    const std::int32_t types[] = {ioPNG, ioBMP, ioJPEG, ioWBMP};
    const auto seed = static_cast<std::uint32_t>(number);
    const auto image = test::MakeNoise(zm24RGB, 61 + number, 47, seed);
    for (int round = 0; round < 8; ++round) {
        const std::int32_t type = types[(number + round) % 4];
        const std::u16string name = folder.Name("t" + std::to_string(number));
        TIOParams params;
        params.SetDpiX(100 + number);
        ASSERT_TRUE(image->Write(name, type, &params));
        TZmBitmap loaded;
        TIOParams told;
        const auto driver = TZalmoIO::CreateFromBitmap(&loaded);
        ASSERT_TRUE(driver->LoadFromFile(name, type));
        ASSERT_TRUE(told.Read(name, type));
        EXPECT_EQ(61 + number, told.fWidth);
        if (type == ioPNG || type == ioBMP) {
            test::ExpectSamePixels(*image, loaded);
            EXPECT_EQ(100 + number, told.GetDpiX());
        }
    }
}

TEST_F(Threads, EightThreadsLoadAndSaveAtOnce) {
    std::vector<std::thread> threads;
    for (int number = 0; number < 8; ++number) {
        threads.emplace_back([this, number] { SaveAndLoad(folder_, number); });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

}  // namespace
}  // namespace zm
