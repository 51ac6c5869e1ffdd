#include <gtest/gtest.h>

#include <windows.h>

#include <thread>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstreams.h"
#include "engine/platform/files.h"
#include "engine/platform/hostboundary.h"
#include "tests/support/testfiles.h"

namespace zm {
namespace {

using test::ReadFileBytes;
using test::TempFolder;
using test::WriteFileBytes;
using TBytes = std::vector<std::uint8_t>;

bool SaveOver(const std::u16string& name) {
    TZmSaveFileStream stream(name);
    stream.WriteBuffer("N", 1);
    return stream.Commit();
}

TEST(Win32Boundary, OperatingSystemExceptionsAreCaughtWithTheirCode) {
    std::u16string message;
    EXPECT_FALSE(platform::CallCatchingHostExceptions(
        [] { RaiseException(0xE0123ABC, 0, 0, nullptr); }, message));
    EXPECT_EQ(message, u"exception E0123ABC");
    EXPECT_FALSE(platform::CallCatchingHostExceptions(
        [] {
            volatile int* volatile nowhere = nullptr;
            *nowhere = 1;
        },
        message));
    EXPECT_EQ(message, u"exception C0000005");
    platform::CallCatchingHostExceptions(
        [] { platform::GuardHostCall([] { throw EZmException(std::string(100000, 'x')); }); },
        message);
    EXPECT_GT(message.size(), 1000u) << "a very long message is cut, not overrun";
    EXPECT_EQ(message, std::u16string(message.size(), u'x'));
}

TEST(Win32Boundary, TheChainOfHandlersIsAsItWas) {
    const auto head = [] {
        void* first = nullptr;
        asm volatile("movl %%fs:0, %0" : "=r"(first));
        return first;
    };
    void* const before = head();
    std::u16string message;
    platform::CallCatchingHostExceptions([] {}, message);
    EXPECT_EQ(head(), before);
    platform::CallCatchingHostExceptions([] { RaiseException(0xE0000001, 0, 0, nullptr); },
                                         message);
    EXPECT_EQ(head(), before);
    platform::CallCatchingHostExceptions([] { throw EZmException("x"); }, message);
    EXPECT_EQ(head(), before);
}

TEST(Win32Boundary, ThreadsHaveMessagesOfTheirOwn) {
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; ++i) {
        threads.emplace_back([i] {
            const std::string text = "thread " + std::to_string(i);
            for (int round = 0; round < 200; ++round) {
                std::u16string message;
                platform::CallCatchingHostExceptions(
                    [&] { platform::GuardHostCall([&] { throw EZmException(text); }); }, message);
                ASSERT_EQ(message, std::u16string(text.begin(), text.end()));
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
}

TEST(Win32Files, AFileThatIsHeldOpenIsNotReplaced) {
    const TempFolder folder;
    WriteFileBytes(folder.File("a"), {'o'});
    {
        TFileStream holder(folder.Name("a"), fmOpenRead);
        EXPECT_FALSE(SaveOver(folder.Name("a")));
    }
    EXPECT_EQ(ReadFileBytes(folder.File("a")), TBytes{'o'});
    EXPECT_EQ(test::ListFolder(folder.Path()), std::vector<std::string>{"a"});
    EXPECT_TRUE(SaveOver(folder.Name("a")));
    EXPECT_EQ(ReadFileBytes(folder.File("a")), TBytes{'N'});
}

TEST(Win32Files, NamesBeyondTheClassicLimit) {
    const TempFolder folder;
    std::u16string deep = folder.Name("x");
    for (int i = 0; i < 6; ++i) {
        deep += u"\\" + std::u16string(60, static_cast<char16_t>(u'a' + i));
    }
    ASSERT_TRUE(platform::CreateFolder(deep));
    const std::u16string name = deep + u"\\picture.png";
    ASSERT_TRUE(SaveOver(name));
    ASSERT_TRUE(SaveOver(name));
    EXPECT_TRUE(platform::FileExists(name));
    EXPECT_TRUE(platform::RemoveFile(name));
    while (deep.size() > folder.Name("x").size()) {
        const std::u16string lifted = u"\\\\?\\" + platform::AbsolutePath(deep);
        EXPECT_TRUE(RemoveDirectoryW(reinterpret_cast<const wchar_t*>(lifted.c_str())));
        deep.resize(deep.rfind(u'\\'));
    }
}

TEST(Win32Files, BothSeparatorsAndDevices) {
    EXPECT_TRUE(platform::IsPathSeparator(u'\\'));
    EXPECT_TRUE(platform::IsPathSeparator(u'/'));
    EXPECT_EQ(platform::GetFileKind(u"NUL"), platform::fkOther);
    EXPECT_TRUE(SaveOver(u"NUL"));
}

}  // namespace
}  // namespace zm
