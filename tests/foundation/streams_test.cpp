#include "engine/foundation/zmstreams.h"

#include <gtest/gtest.h>

#include <array>
#include <limits>
#include <numeric>

#include "engine/platform/files.h"
#include "tests/support/testfiles.h"
#include "tests/support/testmessage.h"

namespace zm {
namespace {

using test::ListFolder;
using test::MessageOf;
using test::ReadFileBytes;
using test::TempFolder;
using test::WriteFileBytes;
using TBytes = std::vector<std::uint8_t>;

/// Letters of two, three and four bytes in UTF-8.
constexpr char kPictureName[] = "\xC3\xA4\xE2\x82\xAC\xF0\x9F\x96\xBC.bin";

TBytes Counting(std::size_t count) {
    TBytes bytes(count);
    std::iota(bytes.begin(), bytes.end(), std::uint8_t{0});
    return bytes;
}

/// Reads, positions and ends are the same over every stream of the ten bytes 0 to 9.
void ExpectTenCountingBytes(TStream& stream) {
    std::array<std::uint8_t, 16> buffer{};
    EXPECT_EQ(stream.GetSize(), 10);
    EXPECT_EQ(stream.Seek(3, soBeginning), 3);
    EXPECT_EQ(stream.Read(buffer.data(), 2), 2);
    EXPECT_EQ(buffer[1], 4);
    EXPECT_EQ(stream.Seek(-1, soCurrent), 4);
    EXPECT_EQ(stream.Seek(-2, soEnd), 8);
    EXPECT_EQ(stream.Read(buffer.data(), 16), 2) << "less at the end";
    EXPECT_EQ(stream.Read(buffer.data(), 16), 0);
    EXPECT_EQ(stream.Read(buffer.data(), 0), 0);
    EXPECT_EQ(stream.Read(buffer.data(), -1), 0);
    EXPECT_EQ(stream.Seek(-50, soCurrent), 0) << "not below the start";
    EXPECT_EQ(stream.Seek(20, soBeginning), 20) << "behind the end";
    EXPECT_EQ(stream.Read(buffer.data(), 1), 0);
    EXPECT_EQ(stream.GetSize(), 10);
    EXPECT_EQ(stream.GetPosition(), 20) << "asking the size moves nothing";
    stream.SetPosition(6);
    EXPECT_THROW(stream.ReadBuffer(buffer.data(), 5), EReadError);
    stream.SetPosition(5);
    EXPECT_NO_THROW(stream.ReadBuffer(buffer.data(), 5));
    EXPECT_EQ(buffer[4], 9);
}

TEST(Streams, ReadAndSeekAlikeOverMemoryAndFiles) {
    const TBytes bytes = Counting(10);
    TMemoryStream memory(bytes);
    ExpectTenCountingBytes(memory);
    TBorrowedMemoryStream borrowed(bytes.data(), 10);
    ExpectTenCountingBytes(borrowed);
    const TempFolder folder;
    WriteFileBytes(folder.File("ten"), bytes);
    TFileStream file(folder.Name("ten"), fmOpenRead);
    ExpectTenCountingBytes(file);
    TZmSaveFileStream saved(folder.Name("saved"));
    saved.WriteBuffer(bytes.data(), bytes.size());
    ExpectTenCountingBytes(saved);
}

TEST(Streams, MemoryGrowsWithZerosBetween) {
    TMemoryStream stream;
    stream.Seek(3, soBeginning);
    EXPECT_EQ(stream.Write("ab", 2), 2);
    stream.Seek(4, soBeginning);
    EXPECT_EQ(stream.Write("c", 1), 1);
    EXPECT_EQ(stream.Bytes(), (TBytes{0, 0, 0, 'a', 'c'}));
    EXPECT_EQ(stream.Write("x", 0), 0);
    EXPECT_EQ(stream.Write("x", -4), 0);
}

TEST(Streams, WithoutRoomAMemoryStreamWritesShort) {
    const TBytes bytes = Counting(2);
    TBorrowedMemoryStream borrowed(bytes.data(), 2);
    EXPECT_THROW(borrowed.WriteBuffer("ab", 2), EWriteError);
    TMemoryStream stream;
    EXPECT_EQ(stream.Seek(std::numeric_limits<std::int64_t>::max(), soBeginning),
              std::numeric_limits<std::int64_t>::max());
    EXPECT_EQ(stream.Seek(5, soCurrent), std::numeric_limits<std::int64_t>::max());
    EXPECT_EQ(stream.Write("ab", 2), 0);
    if (sizeof(void*) == 4) {
        stream.Seek(0x7FFFFFF0, soBeginning);
        EXPECT_EQ(stream.Write("ab", 2), 0) << "no block of that size exists";
    }
    EXPECT_THROW(stream.WriteBuffer("ab", 2), EWriteError);
    EXPECT_EQ(stream.GetSize(), 0);
}

TEST(FileStreams, OpenChangeAndCreate) {
    const TempFolder folder;
    const std::u16string name = folder.Name(kPictureName);
    {
        TFileStream created(name, fmCreate);
        created.WriteBuffer("0123456789", 10);
    }
    {
        TFileStream changed(name, fmOpenReadWrite);
        changed.Seek(-3, soEnd);
        changed.WriteBuffer("xy", 2);
    }
    EXPECT_EQ(ReadFileBytes(folder.File(kPictureName)),
              (TBytes{'0', '1', '2', '3', '4', '5', '6', 'x', 'y', '9'}));
    TFileStream emptied(name, fmCreate);
    EXPECT_EQ(emptied.GetSize(), 0);
}

TEST(FileStreams, FailuresNameTheFileAndTheReason) {
    const TempFolder folder;
    const std::string missing =
        MessageOf<EFOpenError>([&] { TFileStream(folder.Name("missing.png"), fmOpenRead); });
    EXPECT_NE(missing.find("missing.png\". "), std::string::npos) << missing;
    EXPECT_GT(missing.size(), missing.find("\". ") + 6) << "the reason follows: " << missing;
    EXPECT_THROW(TFileStream(folder.Name("no/folder.png"), fmCreate), EFCreateError);
    EXPECT_THROW(TFileStream(folder.Name(""), fmOpenRead), EFOpenError) << "a folder";
    EXPECT_THROW(TFileStream(std::u16string(), fmOpenRead), EFOpenError);
    WriteFileBytes(folder.File("a"), {1});
    const std::u16string with_zero = folder.Name("a") + std::u16string(u"\0b", 2);
    EXPECT_THROW(TFileStream(with_zero, fmOpenRead), EFOpenError);
    EXPECT_THROW(TZmSaveFileStream{with_zero}, EFCreateError);
    EXPECT_FALSE(platform::FileExists(with_zero));
}

class SaveStream : public testing::Test {
protected:
    const TempFolder folder_;
    const TBytes old_bytes_{'o', 'l', 'd'};
    const TBytes new_bytes_{'n', 'e', 'w', '!'};

    void WriteNew(TZmSaveFileStream& stream) const {
        stream.WriteBuffer(new_bytes_.data(), new_bytes_.size());
    }
};

TEST_F(SaveStream, CommitPutsTheNewFileInPlace) {
    for (const bool existing : {false, true}) {
        const std::string name = existing ? "old.bin" : "\xC3\xBC.bin";
        if (existing) {
            WriteFileBytes(folder_.File(name), old_bytes_);
        }
        TZmSaveFileStream stream(folder_.Name(name));
        WriteNew(stream);
        EXPECT_EQ(platform::FileExists(folder_.Name(name)), existing) << "until the commit";
        ASSERT_TRUE(stream.Commit());
        EXPECT_FALSE(stream.Commit()) << "only once";
        EXPECT_EQ(ReadFileBytes(folder_.File(name)), new_bytes_);
    }
    EXPECT_EQ(ListFolder(folder_.Path()).size(), 2u);
}

TEST_F(SaveStream, WithoutCommitTheOldFileStaysAlone) {
    WriteFileBytes(folder_.File("a"), old_bytes_);
    {
        TZmSaveFileStream stream(folder_.Name("a"));
        WriteNew(stream);
        EXPECT_EQ(ListFolder(folder_.Path()).size(), 2u) << "the temporary file is beside it";
    }
    EXPECT_EQ(ListFolder(folder_.Path()), std::vector<std::string>{"a"});
    EXPECT_EQ(ReadFileBytes(folder_.File("a")), old_bytes_);
}

TEST_F(SaveStream, EarlierBytesCanBeWrittenAnew) {
    TZmSaveFileStream stream(folder_.Name("a"));
    stream.WriteBuffer("....data", 8);
    stream.SetPosition(0);
    stream.WriteBuffer("size", 4);
    EXPECT_EQ(stream.GetSize(), 8);
    ASSERT_TRUE(stream.Commit());
    EXPECT_EQ(ReadFileBytes(folder_.File("a")), (TBytes{'s', 'i', 'z', 'e', 'd', 'a', 't', 'a'}));
}

TEST_F(SaveStream, TargetsThatCannotBeMadeAreToldAtOnce) {
    WriteFileBytes(folder_.File("file"), old_bytes_);
    platform::CreateFolder(folder_.Name("sub"));
    for (const std::string name : {"missing/a.png", "file/a.png", "sub"}) {
        const std::string message =
            MessageOf<EFCreateError>([&] { TZmSaveFileStream stream(folder_.Name(name)); });
        EXPECT_NE(message.find(name.substr(name.rfind('/') + 1) + "\". "), std::string::npos)
            << message;
    }
    EXPECT_EQ(ListFolder(folder_.Path()), (std::vector<std::string>{"file", "sub"}));
    EXPECT_TRUE(ListFolder(folder_.File("sub")).empty());
}

TEST_F(SaveStream, AWriteProtectedTargetIsNotReplaced) {
    using std::filesystem::perms;
    const auto all_writers = perms::owner_write | perms::group_write | perms::others_write;
    WriteFileBytes(folder_.File("a"), old_bytes_);
    std::filesystem::permissions(folder_.File("a"), all_writers,
                                 std::filesystem::perm_options::remove);
    const bool refused = MessageOf<EFOpenError>([&] {
                             TFileStream(folder_.Name("a"), fmOpenReadWrite);
                         }) != "nothing raised";  // root may write protected files
    if (refused) {
        EXPECT_THROW(TZmSaveFileStream{folder_.Name("a")}, EFCreateError);
    }
    EXPECT_EQ(ReadFileBytes(folder_.File("a")), old_bytes_);
    std::filesystem::permissions(folder_.File("a"), perms::owner_write,
                                 std::filesystem::perm_options::add);
}

TEST_F(SaveStream, ARelativeNameIsReplacedInTheCurrentFolder) {
    const auto before = std::filesystem::current_path();
    std::filesystem::current_path(folder_.Path());
    TZmSaveFileStream stream(u"plain.bin");
    WriteNew(stream);
    EXPECT_TRUE(stream.Commit());
    std::filesystem::current_path(before);
    EXPECT_EQ(ReadFileBytes(folder_.File("plain.bin")), new_bytes_);
}

}  // namespace
}  // namespace zm
