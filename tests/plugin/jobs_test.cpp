// Jobs side by side in the built module.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>
#include <thread>
#include <vector>

#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfiletypes.h"
#include "tests/plugin/testhost.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::uint32_t kJobs = 8;
constexpr int kRounds = 3;

/// Opens, resizes, crops, borders, draws a picture and a text, and saves under a job of its own;
/// also meets every kind of failure on the way. True when each step did what it should.
bool RunJob(TPluginCaller& caller, std::uint32_t task, const std::u16string& input,
            const std::u16string& output) {
    bool good = !caller.Exec(gaResizeImage, u"image_w=10\r\nimage_h=10", task);
    good &= caller.Exec(gaOpenImage, u"image_file=" + input, task);
    good &= caller.Exec(gaResizeImage, u"image_w=400\r\nimage_h=300\r\nkeep_aspect_ratio=0", task);
    good &= caller.Exec(gaCropImage, u"l=10\r\nt=10\r\nr=-10\r\nb=-10", task);
    good &= !caller.Exec(gaCropImage, u"l=5\r\nr=5", task);
    good &= caller.Exec(gaAddBorder, u"l={w}\r\nt={w}\r\nr={w}\r\nb={w}\r\ncolor=255", task);
    good &= caller.Exec(gaImageOnImage, u"opacity=60\r\nx_pos=2\r\nimage_file=" + input, task);
    good &= caller.Exec(gaTextOnImage,
                        u"text=Job " + IntegerToText(static_cast<std::int32_t>(task)) +
                            u" \u05E9\u05DC\r\nfont_size=40\r\nfont_styles=7\r\nx_pos=1",
                        task);
    good &= !caller.Exec(gaOpenImage, u"image_file=" + input + u".missing", task);
    good &= caller.Exec(gaSaveImage, u"format=1\r\nimage_file=" + output, task);
    caller.JobStop(gaOpenImage, task);
    return good && !caller.Exec(gaSaveImage, u"format=1\r\nimage_file=" + output, task);
}

TEST(Jobs, EightAtOnceGiveTheSameFilesAsOneAfterTheOther) {
    ASSERT_NE(LoadedModule().caller, nullptr);
    TPluginCaller& caller = *LoadedModule().caller;
    TTestHost& host = LoadedModule().host;
    host.variables[u"w"] = u"4";
    host.ForgetReports();
    TempFolder folder;
    const std::int64_t before = host.OutstandingBytes();
    const auto file = [&folder](const char* kind, std::uint32_t job) {
        return folder.Name(kind + std::to_string(job) + ".png");
    };
    for (std::uint32_t job = 0; job < kJobs; ++job) {
        auto picture = MakeNoise(zm24RGB, 500 + static_cast<std::int32_t>(job), 350, job);
        ASSERT_TRUE(picture->Write(file("in", job), ioPNG, nullptr));
        ASSERT_TRUE(RunJob(caller, job, file("in", job), file("single", job)));
    }
    std::vector<char> good(kJobs, 0);
    std::vector<std::thread> threads;
    for (std::uint32_t job = 0; job < kJobs; ++job) {
        threads.emplace_back([&, job] {
            bool all_good = true;
            for (int round = 0; round < kRounds; ++round) {
                all_good &= RunJob(caller, job, file("in", job), file("multi", job));
            }
            good[job] = all_good ? 1 : 0;
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(good, std::vector<char>(kJobs, 1));
    for (std::uint32_t job = 0; job < kJobs; ++job) {
        const std::string number = std::to_string(job) + ".png";
        EXPECT_EQ(ReadFileBytes(folder.File("single" + number)),
                  ReadFileBytes(folder.File("multi" + number)));
    }
    EXPECT_EQ(host.OutstandingBytes(), before);
    EXPECT_EQ(host.HeapFaults(), 0);
    // Each run of a job reports four failures: two without an image, two of its own.
    EXPECT_EQ(host.Errors().size(), static_cast<std::size_t>(kJobs) * (kRounds + 1) * 4);
}

}  // namespace
}  // namespace zm::test
