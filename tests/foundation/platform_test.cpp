#include <gtest/gtest.h>

#include <cstring>
#include <stdexcept>
#include <string>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/console.h"
#include "engine/platform/files.h"
#include "engine/platform/hostboundary.h"
#include "engine/platform/memory.h"
#include "engine/platform/module.h"
#include "engine/platform/tempmapping.h"
#include "tests/support/testfiles.h"

namespace zm::platform {
namespace {

/// Tells that its frame was cleaned up.
struct TWitness {
    explicit TWitness(bool& flag) : flag_(flag) {}
    ~TWitness() { flag_ = true; }
    bool& flag_;
};

TEST(HostBoundary, AnExceptionReachesTheHostWithItsTextAfterOurCleanUp) {
    bool cleaned = false;
    std::u16string message;
    const bool ended = CallCatchingHostExceptions(
        [&] {
            GuardHostCall([&] {
                const TWitness witness(cleaned);
                throw EZmException("Bild \xC3\xA4 fehlt");
            });
        },
        message);
    EXPECT_FALSE(ended);
    EXPECT_TRUE(cleaned);
    EXPECT_EQ(message, u"Bild \x00E4 fehlt");
}

TEST(HostBoundary, NormalEndsAndOtherThrownThings) {
    std::u16string message = u"kept";
    int calls = 0;
    EXPECT_TRUE(CallCatchingHostExceptions([&] { GuardHostCall([&] { ++calls; }); }, message));
    EXPECT_EQ(calls, 1);
    EXPECT_EQ(message, u"kept");
    EXPECT_FALSE(CallCatchingHostExceptions([] { GuardHostCall([] { throw 42; }); }, message));
    EXPECT_EQ(message, u"unknown exception");
    EXPECT_FALSE(CallCatchingHostExceptions([] { throw std::runtime_error("plain"); }, message));
    EXPECT_EQ(message, u"plain");
    EXPECT_EQ(SendHostMessage(nullptr, 24601, 1, 2), 0) << "a nil window answers nothing";
}

TEST(HostBoundary, CatchesAgainAndAgainAndInsideOneAnother) {
    for (int i = 0; i < 1000; ++i) {
        std::u16string outer;
        std::u16string inner;
        const bool ended = CallCatchingHostExceptions(
            [&] {
                EXPECT_FALSE(CallCatchingHostExceptions(
                    [] { GuardHostCall([] { throw std::runtime_error("inner"); }); }, inner));
                GuardHostCall([] { throw std::runtime_error("outer"); });
            },
            outer);
        ASSERT_FALSE(ended);
        ASSERT_EQ(inner, u"inner");
        ASSERT_EQ(outer, u"outer");
    }
}

TEST(Modules, TheProgramKnowsItsPath) {
    static const int anchor = 0;
    const std::u16string program = ProgramPath();
    EXPECT_TRUE(FileExists(program));
    EXPECT_NE(FileBaseName(program).find(u"foundation_test"), std::u16string::npos);
    EXPECT_EQ(ModulePathOf(&anchor), program);
    int local = 0;
    EXPECT_TRUE(ModulePathOf(&local).empty()) << "the stack belongs to no module";
}

TEST(Modules, ALibraryThatIsNoneTellsWhy) {
    const test::TempFolder folder;
    test::WriteFileBytes(folder.File("x.qvp"), {'n', 'o'});
    for (const char* const name : {"x.qvp", "missing.qvp"}) {
        std::string reason;
        EXPECT_EQ(LoadLibraryFile(folder.Name(name), reason), nullptr);
        EXPECT_FALSE(reason.empty()) << name;
    }
}

TEST(Files, KindsFoldersAndRemoval) {
    const test::TempFolder folder;
    const std::u16string deep = folder.Name("a") + u"/b/\x00FC/c";
    EXPECT_TRUE(CreateFolder(deep));
    EXPECT_TRUE(CreateFolder(deep)) << "there already";
    test::WriteFileBytes(folder.File("file"), {1});
    EXPECT_FALSE(CreateFolder(folder.Name("file")));
    EXPECT_FALSE(CreateFolder(folder.Name("file") + u"/x"));
    EXPECT_EQ(GetFileKind(folder.Name("file")), fkRegular);
    EXPECT_EQ(GetFileKind(deep), fkFolder);
    EXPECT_EQ(GetFileKind(folder.Name("none")), fkNone);
    EXPECT_FALSE(FileExists(deep));
    EXPECT_FALSE(FolderExists(folder.Name("file")));
    EXPECT_FALSE(RemoveFile(deep)) << "a folder is no file";
    EXPECT_TRUE(RemoveFile(folder.Name("file")));
    EXPECT_FALSE(RemoveFile(folder.Name("file")));
    const std::u16string temporary = TemporaryFolder();
    EXPECT_TRUE(FolderExists(temporary));
    EXPECT_TRUE(IsPathSeparator(temporary.back()));
    EXPECT_EQ(AbsolutePath(temporary), temporary);
    EXPECT_GT(AbsolutePath(u"x.png").size(), 6u);
}

TEST(Files, TimesComeBackAsTheyWereSet) {
    const test::TempFolder folder;
    test::WriteFileBytes(folder.File("a"), {1});
    EXPECT_FALSE(GetFileTimes(folder.Name("none")));
    TFileTimes times;
    times.created_ns = 1'000'000'000'000'000'000;
    times.modified_ns = 1'234'567'890'123'456'700;  // a multiple of the coarser clock's step
    times.accessed_ns = -1'000'000'000;             // the last second of 1969
    ASSERT_TRUE(SetFileTimes(folder.Name("a"), times));
    const auto read = GetFileTimes(folder.Name("a"));
    ASSERT_TRUE(read);
    EXPECT_EQ(read->modified_ns, times.modified_ns);
    EXPECT_EQ(read->accessed_ns, times.accessed_ns);
    EXPECT_NE(read->created_ns, 0);
}

TEST(Memory, MachineAndHeap) {
    EXPECT_GT(PhysicalMemoryBytes(), 16 << 20);
    EXPECT_GE(PhysicalCoreCount(), 1);
    EXPECT_EQ(SystemHeapAllocate(0), nullptr);
    constexpr std::size_t kBytes = (5 << 20) + 3;
    auto* const block = static_cast<std::uint8_t*>(SystemHeapAllocate(kBytes));
    ASSERT_NE(block, nullptr);
    EXPECT_EQ(block[0] | block[kBytes / 2] | block[kBytes - 1], 0);
    block[kBytes - 1] = 1;
    SystemHeapFree(block, kBytes);
    SystemHeapFree(nullptr, 10);
    EXPECT_EQ(SystemHeapAllocate(~std::size_t{0} / 2), nullptr);
}

TEST(Memory, WindowsOfAMappingShowTheFile) {
    const std::size_t step = WindowAlignment();
    ASSERT_EQ(step & (step - 1), 0u);
    const auto size = static_cast<std::int64_t>(3 * step);
    const auto mapping = CreateTemporaryMapping(u"", "a/../b", size);
    ASSERT_NE(mapping, nullptr);
    auto* const whole = static_cast<std::uint8_t*>(mapping->MapWindow(0, 3 * step));
    auto* const last =
        static_cast<std::uint8_t*>(mapping->MapWindow(static_cast<std::int64_t>(2 * step), step));
    ASSERT_NE(whole, nullptr);
    ASSERT_NE(last, nullptr);
    whole[2 * step + 5] = 99;
    EXPECT_EQ(last[5], 99);
    mapping->UnmapWindow(whole, 3 * step);
    mapping->UnmapWindow(last, step);
    EXPECT_FALSE(mapping->Resize(0));
}

TEST(Console, Environment) {
    EXPECT_FALSE(EnvironmentVariable("ZM_NO_SUCH_VARIABLE_HERE"));
    EXPECT_TRUE(EnvironmentVariable("PATH"));
}

}  // namespace
}  // namespace zm::platform
