#include <gtest/gtest.h>

#include "engine/bitmap/zmxBitmaps.h"
#include "engine/io/zmfiletypes.h"
#include "tests/support/testfiles.h"
#include "tests/support/testimages.h"
#include "tests/support/testprocess.h"

/// qvrun as a user calls it: the built program with the built plug-in beside it.
namespace zm::test {
namespace {

std::string Program() {
    return (std::filesystem::path(ZM_MODULE_DIR) / "qvrun").string();
}

class QvRun : public ::testing::Test {
protected:
    void SavePicture(const std::string& name, std::int32_t width, std::int32_t height) {
        auto picture = MakeGradient(zm24RGB, width, height);
        ASSERT_TRUE(picture->Write(folder_.Name(name), ioPNG, nullptr));
    }
    std::string WriteText(const std::string& name, const std::string& text) {
        WriteFileBytes(folder_.File(name), {text.begin(), text.end()});
        return folder_.File(name).string();
    }
    TProcessResult Run(const std::string& arguments) {
        return RunProcess(Program() + " " + arguments, folder_.Path());
    }
    std::string Path(const std::string& name) const { return folder_.File(name).string(); }
    bool Exists(const std::string& name) const {
        return std::filesystem::exists(folder_.File(name));
    }

    TempFolder folder_;
};

constexpr char kSmallJob[] =
    "[open image]\nimage_file={file}\n"
    "[A_GRAPHICS_RESIZE_IMAGE]\nimage_w={side}\nimage_h={side}\n"
    "[Save Image]\nimage_file={out}/{name}-{index}.bmp\nformat=3\n";

TEST_F(QvRun, ListsTheActions) {
    const TProcessResult result = Run("actions");
    EXPECT_EQ(result.exit_status, 0) << result.standard_error;
    EXPECT_NE(result.standard_output.find("A_GRAPHICS_ADD_BORDER_TO_IMAGE"), std::string::npos);
    EXPECT_EQ(std::count(result.standard_output.begin(), result.standard_output.end(), '\n'), 8);
}

TEST_F(QvRun, RunsTheJobOncePerFile) {
    SavePicture("a.png", 40, 20);
    SavePicture("b.png", 20, 40);
    const std::string job = WriteText("small.qvjob", kSmallJob);
    // Settings take one word each, also in front of files.
    const TProcessResult result =
        Run("run " + job + " --jobs 2 --output " + Path("made/here") +
            " --set side=10 --set more=1 " + Path("a.png") + " " + Path("b.png"));
    ASSERT_EQ(result.exit_status, 0) << result.standard_error;
    EXPECT_NE(result.standard_error.find("2 done, 0 failed"), std::string::npos);
    TZmBitmap small;
    ASSERT_TRUE(small.Read(folder_.Name("made/here/a-1.bmp"), nullptr, false));
    EXPECT_EQ(small.GetWidth(), 10);
    EXPECT_EQ(small.GetHeight(), 5);
    EXPECT_TRUE(Exists("made/here/b-2.bmp"));
}

TEST_F(QvRun, TakesNamesFromStandardInput) {
    SavePicture("a.png", 8, 8);
    const std::string job = WriteText("small.qvjob", kSmallJob);
    const std::string list = WriteText("list.txt", Path("a.png") + "\r\n\n" + Path("a.png"));
    const std::string tail = " --set side=4 -o " + Path("out") + " <" + list;
    EXPECT_EQ(Run("run " + job + " -" + tail).exit_status, 0);
    EXPECT_TRUE(Exists("out/a-1.bmp"));
    EXPECT_TRUE(Exists("out/a-2.bmp"));
    EXPECT_FALSE(Exists("out/a-3.bmp"));
}

TEST_F(QvRun, AJobFileMayBeAPipe) {
    if (std::filesystem::path::preferred_separator != '/') {
        GTEST_SKIP() << "the shell of this system names no pipes";
    }
    SavePicture("a.png", 8, 8);
    const std::string job = WriteText("small.qvjob", kSmallJob);
    const TProcessResult result =
        RunProcess("cat " + job + " | " + Program() + " run /dev/stdin --set side=4 -o " +
                       Path("out") + " " + Path("a.png"),
                   folder_.Path());
    EXPECT_EQ(result.exit_status, 0) << result.standard_error;
    EXPECT_TRUE(Exists("out/a-1.bmp"));
}

TEST_F(QvRun, AFailedStepIsShownAndTheOthersGoOn) {
    SavePicture("good.png", 8, 8);
    WriteText("bad.png", "no picture at all");
    const std::string job = WriteText("small.qvjob", kSmallJob);
    const TProcessResult result =
        Run("run " + job + " " + Path("bad.png") + " " + Path("missing.png") + " " +
            Path("good.png") + " --set side=4 -o " + Path("out"));
    EXPECT_EQ(result.exit_status, 1);
    EXPECT_NE(result.standard_error.find("step 1 (Open Image, line 1) failed, code 4: "
                                         "Cannot read image file"),
              std::string::npos)
        << result.standard_error;
    EXPECT_NE(result.standard_error.find("code 3: File "), std::string::npos);
    EXPECT_NE(result.standard_error.find("1 done, 2 failed"), std::string::npos);
    EXPECT_TRUE(Exists("out/good-3.bmp"));
}

TEST_F(QvRun, ShowsStepsThatFailSilentlyAndThoseThatRaise) {
    SavePicture("a.png", 8, 8);
    const std::string silent =
        WriteText("silent.qvjob", "[Open Image]\nimage_file={file}\n[Resize Image]\nimage_w=5\n");
    TProcessResult result = Run("run " + silent + " " + Path("a.png"));
    EXPECT_EQ(result.exit_status, 1);
    EXPECT_NE(result.standard_error.find("step 2 (Resize Image, line 3) failed: the action failed "
                                         "without telling why: Resize image to 5px x ?px"),
              std::string::npos)
        << result.standard_error;
    const std::string raising =
        WriteText("raising.qvjob", "[Open Image]\nimage_file={file}\n[Save Image]\nimage_file=" +
                                       Path("nowhere/at/all.jpg") + "\n");
    result = Run("run " + raising + " " + Path("a.png"));
    EXPECT_EQ(result.exit_status, 1);
    EXPECT_NE(result.standard_error.find("all.jpg"), std::string::npos) << result.standard_error;
    EXPECT_EQ(ListFolder(folder_.Path()).size(), 5u) << "something was left behind";
}

TEST_F(QvRun, DryRunDescribesAndRunsNothing) {
    const std::string job = WriteText("small.qvjob", kSmallJob);
    const TProcessResult result = Run("run --dry-run " + job);
    EXPECT_EQ(result.exit_status, 0) << result.standard_error;
    EXPECT_EQ(result.standard_output,
              "1. Open image from '{file}'\n"
              "2. Resize image to {side}px x {side}px (keep aspect ratio)\n"
              "3. Save image to '{out}/{name}-{index}.bmp'\n");
    EXPECT_EQ(ListFolder(folder_.Path()).size(), 3u);
}

TEST_F(QvRun, UsageAndJobFileErrorsGiveStatusTwo) {
    const std::string bad_line = WriteText("bad.qvjob", "[Open Image]\nimage_file={file}\noops\n");
    const std::string unknown = WriteText("unknown.qvjob", "\n[Paint Image]\n");
    const std::string good = WriteText("small.qvjob", kSmallJob);
    const std::pair<std::string, std::string> cases[] = {
        {"", ""},
        {"fly", ""},
        {"run", ""},
        {"run " + good + " --jobs 0", "--jobs"},
        {"run " + good + " x.png --set nothing", "NAME=VALUE"},
        {"run " + good, "no file"},
        {"run " + Path("absent.qvjob"), "absent.qvjob"},
        {"run " + bad_line + " x.png", "bad.qvjob:3: "},
        {"run " + unknown, "unknown.qvjob:2: unknown action"},
        {"actions --plugin " + Path("absent.qvp"), "absent.qvp"},
    };
    for (const auto& [arguments, part] : cases) {
        const TProcessResult result = Run(arguments);
        EXPECT_EQ(result.exit_status, 2) << arguments;
        EXPECT_NE(result.standard_error.find(part), std::string::npos) << result.standard_error;
    }
}

}  // namespace
}  // namespace zm::test
