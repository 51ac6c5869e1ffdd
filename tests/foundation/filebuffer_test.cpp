#include "engine/foundation/zmutils_filebuffer.h"

#include <gtest/gtest.h>

#include <cstring>
#include <set>

#include "engine/foundation/zmsettings.h"
#include "engine/platform/tempmapping.h"
#include "tests/support/testfiles.h"

namespace zm {
namespace {

/// Distance of the windows' beginnings.
constexpr std::int64_t kWindowBytes = sizeof(void*) == 4 ? (4 << 20) : (16 << 20);

/// A value that differs between neighbouring rows.
std::uint32_t MarkOf(std::int64_t row) {
    return static_cast<std::uint32_t>(row) * 2654435761u + 7;
}

bool WriteMark(TZmFileBuffer& buffer, std::int64_t position, std::uint32_t mark) {
    void* const address = buffer.Map(position, sizeof(mark), zmdReadWrite);
    if (address == nullptr) {
        return false;
    }
    std::memcpy(address, &mark, sizeof(mark));
    buffer.UnMap(address);
    return true;
}

std::uint32_t ReadMark(TZmFileBuffer& buffer, std::int64_t position) {
    std::uint32_t mark = 0;
    void* const address = buffer.Map(position, sizeof(mark), zmdRead);
    if (address != nullptr) {
        std::memcpy(&mark, address, sizeof(mark));
        buffer.UnMap(address);
    }
    return mark;
}

class FileBuffer : public testing::TestWithParam<bool> {
protected:
    bool UseDisk() const { return GetParam(); }
};

INSTANTIATE_TEST_SUITE_P(DiskAndMemory, FileBuffer, testing::Bool());

TEST_P(FileBuffer, RefusesRangesThatAreNotInside) {
    TZmFileBuffer buffer;
    EXPECT_EQ(buffer.Map(0, 1, zmdRead), nullptr);
    EXPECT_FALSE(buffer.AllocateFile(0, "IMG", UseDisk()));
    EXPECT_FALSE(buffer.AllocateFile(-5, "IMG", UseDisk()));
    EXPECT_FALSE(buffer.IsAllocated());
    ASSERT_TRUE(buffer.AllocateFile(1000, "IMG", UseDisk()));
    const std::pair<std::int64_t, std::int64_t> ranges[] = {
        {-1, 10}, {0, 1001}, {1000, 1}, {999, 2}, {5, 0}, {5, -1}, {1, INT64_MAX}, {INT64_MAX, 1},
    };
    for (const auto& [position, size] : ranges) {
        EXPECT_EQ(buffer.Map(position, size, zmdRead), nullptr) << position << " " << size;
    }
    EXPECT_NE(buffer.Map(999, 1, zmdRead), nullptr);
    buffer.DeAllocate();
    EXPECT_EQ(buffer.GetSize(), 0);
    EXPECT_EQ(buffer.Map(0, 1, zmdRead), nullptr);
}

TEST_P(FileBuffer, BeginsWithZerosAndKeepsTheCommonBytesOfAllSizes) {
    TZmFileBuffer buffer;
    EXPECT_FALSE(buffer.ReAllocateFile(10));
    for (int round = 0; round < 2; ++round) {  // an earlier file is dropped
        ASSERT_TRUE(buffer.AllocateFile(5000, "IMG", UseDisk()));
        EXPECT_EQ(ReadMark(buffer, 100), 0u);
        ASSERT_TRUE(WriteMark(buffer, 100, 11));
    }
    ASSERT_TRUE(WriteMark(buffer, 4900, 22));
    void* const held = buffer.Map(0, 1, zmdRead);
    EXPECT_FALSE(buffer.ReAllocateFile(10000)) << "a mapping is held";
    buffer.UnMap(held);
    ASSERT_TRUE(buffer.ReAllocateFile(1 << 20));
    EXPECT_EQ(ReadMark(buffer, 100), 11u);
    EXPECT_EQ(ReadMark(buffer, 4900), 22u);
    EXPECT_EQ(ReadMark(buffer, (1 << 20) - 4), 0u);
    ASSERT_TRUE(buffer.ReAllocateFile(200));
    ASSERT_TRUE(buffer.ReAllocateFile(5000));
    EXPECT_EQ(ReadMark(buffer, 100), 11u);
    EXPECT_EQ(ReadMark(buffer, 4900), 0u) << "cut bytes come back as zeros";
}

TEST_P(FileBuffer, CopiesToBuffersAndStreams) {
    TZmFileBuffer source;
    TZmFileBuffer copy;
    EXPECT_FALSE(source.CopyTo(copy));
    const std::int64_t size = (3 << 20) + 17;
    ASSERT_TRUE(source.AllocateFile(size, "IMG", UseDisk()));
    ASSERT_TRUE(WriteMark(source, 0, 5));
    ASSERT_TRUE(WriteMark(source, size - 4, 6));
    ASSERT_TRUE(source.CopyTo(copy));
    ASSERT_TRUE(WriteMark(source, 0, 9));
    EXPECT_EQ(ReadMark(copy, 0), 5u);
    EXPECT_EQ(ReadMark(copy, size - 4), 6u);
    TMemoryStream stream;
    ASSERT_TRUE(copy.CopyTo(stream));
    EXPECT_EQ(stream.GetSize(), size);
    stream.SetPosition(0);
    TZmFileBuffer back;
    ASSERT_TRUE(back.CopyFrom(stream, size));
    EXPECT_EQ(ReadMark(back, size - 4), 6u);
    EXPECT_FALSE(back.CopyFrom(stream, 1)) << "the stream is at its end";
}

TEST(FileBufferWindows, AWalkOverRowsMapsAnewOncePerWindow) {
    constexpr std::int64_t kRowBytes = 12001;
    constexpr std::int64_t kRows = 5 * kWindowBytes / kRowBytes;
    TZmFileBuffer buffer;
    ASSERT_TRUE(buffer.AllocateFile(kRowBytes * kRows, "IMG", /*use_disk=*/true));
    int breaks = 0;  // rows that do not follow the one before in memory: a new window
    const std::uint8_t* expected = nullptr;
    for (std::int64_t row = 0; row < kRows; ++row) {
        auto* const address =
            static_cast<std::uint8_t*>(buffer.Map(row * kRowBytes, kRowBytes, zmdReadWrite));
        ASSERT_NE(address, nullptr);
        breaks += address == expected ? 0 : 1;
        expected = address + kRowBytes;
        const std::uint32_t mark = MarkOf(row);
        std::memcpy(address, &mark, sizeof(mark));
        buffer.UnMap(address);
        ASSERT_LE(buffer.MappedWindowCount(), 4u);
    }
    EXPECT_EQ(breaks, 5);
    for (std::int64_t row = kRows - 1; row >= 0; --row) {
        ASSERT_EQ(ReadMark(buffer, row * kRowBytes), MarkOf(row)) << row;
        ASSERT_LE(buffer.MappedWindowCount(), 4u);
    }
}

TEST(FileBufferWindows, ARequestAcrossABorderIsOnePiece) {
    TZmFileBuffer buffer;
    ASSERT_TRUE(buffer.AllocateFile(3 * kWindowBytes, "IMG", /*use_disk=*/true));
    ASSERT_TRUE(WriteMark(buffer, kWindowBytes - 4, 1));
    ASSERT_TRUE(WriteMark(buffer, kWindowBytes, 2));
    for (const std::int64_t size : {std::int64_t{8}, kWindowBytes / 2, 2 * kWindowBytes}) {
        auto* const address =
            static_cast<std::uint8_t*>(buffer.Map(kWindowBytes - 4, size, zmdReadWrite));
        ASSERT_NE(address, nullptr) << size;
        const std::uint32_t marks[2] = {1, 2};
        EXPECT_EQ(std::memcmp(address, marks, sizeof(marks)), 0) << size;
        address[size - 1] = 0x80;
        EXPECT_EQ(ReadMark(buffer, kWindowBytes - 4 + size - 4) >> 24, 0x80u)
            << "all windows show the same bytes";
        address[size - 1] = size == 8 ? 0 : 0x80;
        buffer.UnMap(address);
    }
    EXPECT_LE(buffer.MappedWindowCount(), 4u);
}

TEST(FileBufferWindows, WindowsInUseStay) {
    constexpr int kHeld = 8;
    TZmFileBuffer buffer;
    ASSERT_TRUE(buffer.AllocateFile(kHeld * kWindowBytes, "IMG", /*use_disk=*/true));
    std::set<void*> held;
    for (int i = 0; i < kHeld; ++i) {
        auto* const address = buffer.Map(i * kWindowBytes + kWindowBytes / 2, 4, zmdReadWrite);
        ASSERT_NE(address, nullptr);
        std::memcpy(address, &i, sizeof(i));
        held.insert(address);
    }
    EXPECT_EQ(held.size(), static_cast<std::size_t>(kHeld));
    EXPECT_EQ(buffer.MappedWindowCount(), static_cast<std::size_t>(kHeld));
    int sum = 0;
    for (void* const address : held) {
        int value = 0;
        std::memcpy(&value, address, sizeof(value));
        sum += value;
        buffer.UnMap(address);
    }
    EXPECT_EQ(sum, 28);
    EXPECT_LE(buffer.MappedWindowCount(), 4u);
}

TEST(FileBufferWindows, AnAddressIsHeldAsOftenAsItWasMapped) {
    TZmFileBuffer buffer;
    ASSERT_TRUE(buffer.AllocateFile(4096, "IMG", /*use_disk=*/true));
    void* const first = buffer.Map(8, 4, zmdRead);
    void* const second = buffer.Map(8, 16, zmdRead);
    EXPECT_EQ(first, second);
    int stranger = 0;
    buffer.UnMap(&stranger);
    buffer.UnMap(nullptr);
    buffer.UnMap(first);
    EXPECT_FALSE(buffer.ReAllocateFile(8192)) << "still mapped once";
    buffer.UnMap(second);
    buffer.UnMap(second);
    EXPECT_TRUE(buffer.ReAllocateFile(8192));
    buffer.Map(0, 1, zmdRead);
    buffer.Map(1, 1, zmdRead);
    buffer.UnMapAll();
    EXPECT_TRUE(buffer.ReAllocateFile(4096));
}

TEST(FileBufferFile, LivesInTheFolderOfTheSettingsAndLeavesNothing) {
    DestroySingletonInstance();
    const test::TempFolder folder;
    ZmGlobalSettings().fDefTempPath = folder.Name("");
    {
        TZmFileBuffer buffer;
        ASSERT_TRUE(buffer.AllocateFile(1000, "IMG", /*use_disk=*/true));
    }
    EXPECT_TRUE(test::ListFolder(folder.Path()).empty());
    ZmGlobalSettings().fDefTempPath = folder.Name("missing");
    TZmFileBuffer buffer;
    EXPECT_FALSE(buffer.AllocateFile(1000, "IMG", /*use_disk=*/true));
    EXPECT_FALSE(buffer.IsAllocated());
    EXPECT_TRUE(buffer.AllocateFile(1000, "IMG", /*use_disk=*/false));
    DestroySingletonInstance();

    // More than the disk holds is refused, and what is there stays.
    EXPECT_FALSE(buffer.AllocateFile(std::int64_t{1} << 60, "IMG", /*use_disk=*/true));
    ASSERT_TRUE(buffer.AllocateFile(4096, "IMG", /*use_disk=*/true));
    ASSERT_TRUE(WriteMark(buffer, 0, 77));
    EXPECT_FALSE(buffer.ReAllocateFile(std::int64_t{1} << 60));
    EXPECT_EQ(ReadMark(buffer, 0), 77u);
}

}  // namespace
}  // namespace zm
