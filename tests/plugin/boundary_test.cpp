// Exceptions where our code meets a host: they pass, and nothing is broken afterwards.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "engine/foundation/zmstrings.h"
#include "tests/plugin/testhost.h"
#include "tests/plugin/testplatform.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"

namespace zm::test {
namespace {

constexpr std::uint32_t kTask = 4711;

class BoundaryTest : public testing::Test {
protected:
    void SetUp() override { ASSERT_NE(LoadedModule().caller, nullptr); }
    void TearDown() override { Caller().JobStop(gaOpenImage, kTask); }
    TPluginCaller& Caller() { return *LoadedModule().caller; }
    TTestHost& Host() { return LoadedModule().host; }

    void OpenPicture() {
        auto picture = MakeGradient(zm24RGB, 9, 5);
        ASSERT_TRUE(picture->Write(folder.Name("in.bmp"), nullptr));
        ASSERT_TRUE(Caller().Exec(gaOpenImage, u"image_file=" + folder.Name("in.bmp"), kTask));
    }
    /// A handler of another compiler runs no destructors of ours, so the step lives outside.
    TForeignCatch ExecCatching(std::int32_t action, const std::u16string& text) {
        TTestStep step(Host(), text, kTask);
        return CatchAsForeignHost([&] { Caller().Actions().ExecAction(action, &step.params); });
    }
    /// Saves into a folder that does not exist, which the stream answers with an exception.
    TForeignCatch SaveToMissingFolder() {
        return ExecCatching(gaSaveImage,
                            u"format=3\r\nimage_file=" + folder.Name("missing") + u"/out.bmp");
    }

    TempFolder folder;
};

TEST_F(BoundaryTest, AnEngineExceptionReachesTheHostWithItsText) {
    OpenPicture();
    const TForeignCatch caught = SaveToMissingFolder();
    EXPECT_TRUE(caught.exception_came);
    EXPECT_TRUE(caught.is_platform_kind);
    EXPECT_NE(caught.message.find(u"out.bmp"), std::u16string::npos)
        << Utf8FromUtf16(caught.message);
}

TEST_F(BoundaryTest, TheHostAndTheJobGoOnAfterwards) {
    OpenPicture();
    for (int attempt = 0; attempt < 20; ++attempt) {
        ASSERT_TRUE(SaveToMissingFolder().exception_came);
    }
    EXPECT_TRUE(
        Caller().Exec(gaSaveImage, u"format=3\r\nimage_file=" + folder.Name("ok.bmp"), kTask));
    EXPECT_EQ(ListFolder(folder.Path()), (std::vector<std::string>{"in.bmp", "ok.bmp"}));
    EXPECT_EQ(Host().HeapFaults(), 0);
}

/// The host has no memory for the expansion: std::bad_alloc with nothing left behind.
TEST_F(BoundaryTest, MemoryOfTheHostRunsOut) {
    const std::int32_t blocks = Host().OutstandingBlocks();
    Host().refuse_from_bytes = 60000;
    const TForeignCatch caught = ExecCatching(gaOpenImage, u"image_file={x}");
    Host().refuse_from_bytes = 0;
    EXPECT_TRUE(caught.is_platform_kind);
    EXPECT_EQ(Host().OutstandingBlocks(), blocks);
}

}  // namespace
}  // namespace zm::test
