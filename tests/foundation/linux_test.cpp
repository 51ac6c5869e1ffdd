#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <csignal>
#include <filesystem>
#include <thread>

#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "engine/platform/hostboundary.h"
#include "engine/platform/tempmapping.h"
#include "tests/support/testfiles.h"

namespace zm {
namespace {

namespace fs = std::filesystem;
using test::ListFolder;
using test::ReadFileBytes;
using test::TempFolder;
using test::WriteFileBytes;
using TBytes = std::vector<std::uint8_t>;

constexpr mode_t kAllModeBits = 07777;

mode_t ModeOf(const fs::path& path) {
    struct stat info {};
    EXPECT_EQ(::stat(path.c_str(), &info), 0);
    return info.st_mode & kAllModeBits;
}

/// Saves one byte.
bool SaveOver(const std::u16string& name) {
    TZmSaveFileStream stream(name);
    stream.WriteBuffer("N", 1);
    return stream.Commit();
}

/// Limits the size of files while it lives.
class TFileSizeLimit {
public:
    explicit TFileSizeLimit(rlim_t bytes) {
        ::getrlimit(RLIMIT_FSIZE, &before_);
        rlimit limit = before_;
        limit.rlim_cur = bytes;
        ::setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~TFileSizeLimit() { ::setrlimit(RLIMIT_FSIZE, &before_); }

private:
    rlimit before_{};
};

TEST(LinuxSave, NewFilesFollowTheMaskAndOldOnesKeepTheirMode) {
    const TempFolder folder;
    const mode_t mask = ::umask(027);
    ASSERT_TRUE(SaveOver(folder.Name("new")));
    EXPECT_EQ(ModeOf(folder.File("new")), 0640u);
    for (const mode_t mode : {0600u, 0666u, 0751u}) {
        ::chmod(folder.File("new").c_str(), mode);
        ASSERT_TRUE(SaveOver(folder.Name("new")));
        EXPECT_EQ(ModeOf(folder.File("new")), mode);
    }
    ::umask(mask);
}

TEST(LinuxSave, ALinkStaysAndItsEndIsReplaced) {
    const TempFolder folder;
    fs::create_directory(folder.File("sub"));
    WriteFileBytes(folder.File("sub/end"), {'o'});
    fs::create_symlink("sub/second", folder.File("first"));
    fs::create_symlink("end", folder.File("sub/second"));
    fs::create_symlink("sub/new", folder.File("dangling"));
    ASSERT_TRUE(SaveOver(folder.Name("first")));
    ASSERT_TRUE(SaveOver(folder.Name("dangling")));
    EXPECT_TRUE(fs::is_symlink(folder.File("first")));
    EXPECT_TRUE(fs::is_symlink(folder.File("dangling")));
    EXPECT_EQ(ReadFileBytes(folder.File("sub/end")), TBytes{'N'});
    EXPECT_EQ(ReadFileBytes(folder.File("sub/new")), TBytes{'N'});
    EXPECT_EQ(ListFolder(folder.Path()).size(), 3u);
    fs::create_symlink("ring", folder.File("ring"));
    EXPECT_THROW(SaveOver(folder.Name("ring")), EFCreateError);
}

TEST(LinuxSave, AFullDeviceFailsAndNullSwallowsAll) {
    TZmSaveFileStream full(u"/dev/full");
    const std::vector<std::uint8_t> block(100000);
    EXPECT_LT(full.Write(block.data(), 100000), 100000);
    EXPECT_TRUE(full.HasFailed());
    EXPECT_FALSE(full.Commit());
    TZmSaveFileStream null(u"/dev/null");
    null.WriteBuffer(block.data(), block.size());
    EXPECT_EQ(null.GetPosition(), 100000);
    null.SetPosition(10);
    null.WriteBuffer(block.data(), 5);
    EXPECT_TRUE(null.Commit());
    EXPECT_TRUE(fs::is_character_file("/dev/null"));
}

TEST(LinuxSave, AnExceededFileSizeFailsTheSaveAndNotTheProcess) {
    const TempFolder folder;
    WriteFileBytes(folder.File("a"), {'o'});
    {
        const TFileSizeLimit limit(4096);
        TZmSaveFileStream stream(folder.Name("a"));
        const std::vector<std::uint8_t> block(10000);
        EXPECT_EQ(stream.Write(block.data(), 10000), 4096);
        EXPECT_TRUE(stream.HasFailed());
        EXPECT_EQ(stream.Write(block.data(), 10), 0);
        EXPECT_FALSE(stream.Commit());
    }
    EXPECT_EQ(ReadFileBytes(folder.File("a")), TBytes{'o'});
    EXPECT_EQ(ListFolder(folder.Path()), std::vector<std::string>{"a"});
}

TEST(LinuxSave, ATemporaryMappingBeyondTheFileSizeIsRefused) {
    const TFileSizeLimit limit(1 << 20);
    EXPECT_EQ(platform::CreateTemporaryMapping(u"", "IMG", 2 << 20), nullptr);
    const auto mapping = platform::CreateTemporaryMapping(u"", "IMG", 4096);
    ASSERT_NE(mapping, nullptr);
    EXPECT_FALSE(mapping->Resize(2 << 20));
    EXPECT_TRUE(mapping->Resize(8192));
}

TEST(LinuxSave, APipeNeedsAReaderAndOutlivesIt) {
    const TempFolder folder;
    const std::string pipe = folder.File("pipe").native();
    ASSERT_EQ(::mkfifo(pipe.c_str(), 0600), 0);
    EXPECT_THROW(TZmSaveFileStream{folder.Name("pipe")}, EFCreateError) << "nobody reads";
    EXPECT_THROW(TFileStream(folder.Name("pipe"), fmOpenRead), EFOpenError);
    const int reader = ::open(pipe.c_str(), O_RDONLY | O_NONBLOCK);
    TZmSaveFileStream stream(folder.Name("pipe"));
    stream.WriteBuffer("abc", 3);
    EXPECT_EQ(stream.GetPosition(), 3);
    EXPECT_FALSE(stream.HasFailed());
    char text[4] = {};
    EXPECT_EQ(::read(reader, text, 3), 3);
    EXPECT_STREQ(text, "abc");
    TZmSaveFileStream going_back(folder.Name("pipe"));
    going_back.WriteBuffer("abc", 3);
    going_back.SetPosition(0);
    EXPECT_TRUE(going_back.HasFailed());
    EXPECT_FALSE(going_back.Commit());
    ::close(reader);
    EXPECT_EQ(stream.Write("x", 1), 0) << "a broken pipe is an error, not a signal";
    EXPECT_FALSE(stream.Commit());
    EXPECT_TRUE(fs::is_fifo(pipe));
}

TEST(LinuxNames, AnyBytesNameAFile) {
    const TempFolder folder;
    const std::string bytes = "caf\xE9 \xFF\xC3.png";  // Latin-1, not UTF-8
    ASSERT_TRUE(SaveOver(folder.Name(bytes)));
    EXPECT_EQ(ListFolder(folder.Path()), std::vector<std::string>{bytes});
    EXPECT_EQ(ReadFileBytes(folder.Path() / bytes), TBytes{'N'});
}

TEST(LinuxBoundary, MessagesGoToTheHostsFunctionAndExceptionsAsTheyAre) {
    static std::uint32_t seen = 0;
    const platform::THostMessageFunction function = [](std::uint32_t message, std::uintptr_t wparam,
                                                       std::intptr_t lparam) {
        seen = message;
        return static_cast<std::intptr_t>(wparam) - lparam;
    };
    EXPECT_EQ(platform::SendHostMessage(reinterpret_cast<void*>(function), 24601, 50, 8), 42);
    EXPECT_EQ(seen, 24601u);
    EXPECT_THROW(platform::GuardHostCall([] { throw EReadError("x"); }), EReadError);
}

}  // namespace
}  // namespace zm
