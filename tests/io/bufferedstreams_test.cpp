#include "engine/io/zmbufferedstreams.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <limits>
#include <numeric>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/io/zmstreamprovider.h"
#include "tests/support/testmessage.h"

namespace zm {
namespace {

std::vector<std::uint8_t> CountingBytes(std::size_t count) {
    std::vector<std::uint8_t> bytes(count);
    std::iota(bytes.begin(), bytes.end(), std::uint8_t{0});
    return bytes;
}

/// A target that remembers each write and may take only so many bytes.
class TRecordingStream : public TMemoryStream {
public:
    std::int32_t Write(const void* buffer, std::int32_t count) override {
        const std::int32_t taken = std::min(count, room);
        writes.push_back(count);
        room -= taken;
        return TMemoryStream::Write(buffer, taken);
    }
    std::vector<std::int32_t> writes;
    std::int32_t room = 1000000;
};

/// A source that gives at most three bytes a call, and stops early.
class TMeanStream : public TMemoryStream {
public:
    explicit TMeanStream(std::int64_t end) : TMemoryStream(CountingBytes(100)), end_(end) {}
    std::int32_t Read(void* buffer, std::int32_t count) override {
        const std::int64_t left = std::max<std::int64_t>(end_ - GetPosition(), 0);
        return TMemoryStream::Read(
            buffer, static_cast<std::int32_t>(std::min<std::int64_t>(std::min(count, 3), left)));
    }

private:
    std::int64_t end_;
};

std::uint8_t ReadByte(TStream& stream) {
    std::uint8_t byte = 0;
    EXPECT_EQ(1, stream.Read(&byte, 1));
    return byte;
}

TEST(BufferedReadStream, ReadsAcrossBlocksAndCutsAtTheEnd) {
    for (const std::int32_t buffer_size : {1, 2, 3, 7, 8, 9, 64}) {
        TMemoryStream source(CountingBytes(20));
        TZmBufferedReadStream reader(&source, buffer_size, false);
        std::vector<std::uint8_t> got(25, 0xEE);
        EXPECT_EQ(0, ReadByte(reader));
        EXPECT_EQ(12, reader.Read(got.data() + 1, 12));
        EXPECT_FALSE(reader.GetOverPosition());
        EXPECT_EQ(7, reader.Read(got.data() + 13, 12)) << buffer_size;
        EXPECT_TRUE(reader.GetOverPosition());
        for (std::size_t i = 1; i < 20; ++i) {
            EXPECT_EQ(i, got[i]) << buffer_size;
        }
        EXPECT_EQ(0xEE, got[20]);
        EXPECT_EQ(0, reader.Read(got.data(), 1));
        EXPECT_EQ(0, reader.Read(got.data(), 0));
        EXPECT_FALSE(reader.GetOverPosition());
    }
}

TEST(BufferedReadStream, LeavesTheSourceBehindTheLastByteConsumed) {
    TMemoryStream source(CountingBytes(50));
    source.SetPosition(10);
    {
        TZmBufferedReadStream reader(&source, 16, false);
        EXPECT_EQ(10, ReadByte(reader));
        EXPECT_EQ(11, ReadByte(reader));
        EXPECT_EQ(26, source.GetPosition());
    }
    EXPECT_EQ(12, source.GetPosition());
}

TEST(BufferedReadStream, SeeksByTheStatedRules) {
    TMemoryStream source(CountingBytes(50));
    source.SetPosition(5);
    TZmBufferedReadStream reader(&source, 8, false);
    EXPECT_EQ(5, reader.GetPosition());
    EXPECT_EQ(47, reader.Seek(-3, soEnd));
    EXPECT_EQ(47, ReadByte(reader));
    EXPECT_EQ(46, reader.Seek(4, soEnd));  // positive counts backwards too
    EXPECT_EQ(46, ReadByte(reader));
    EXPECT_EQ(0, reader.Seek(-100, soCurrent));
    EXPECT_EQ(0, ReadByte(reader));
    EXPECT_FALSE(reader.GetOverPosition());
    EXPECT_EQ(50, reader.Seek(51, soBeginning));
    EXPECT_TRUE(reader.GetOverPosition());
    EXPECT_EQ(50, reader.Seek(std::numeric_limits<std::int64_t>::max(), soCurrent));
    EXPECT_EQ(0, reader.Seek(std::numeric_limits<std::int64_t>::min(), soEnd));
    EXPECT_EQ(0, ReadByte(reader));
}

TEST(BufferedReadStream, SeeksInsideTheBlockWithoutTouchingTheSource) {
    TMemoryStream source(CountingBytes(50));
    TZmBufferedReadStream reader(&source, 16, false);
    source.SetPosition(33);
    EXPECT_EQ(15, reader.Seek(15, soBeginning));
    EXPECT_EQ(2, reader.Seek(-13, soCurrent));
    EXPECT_EQ(33, source.GetPosition());
    EXPECT_EQ(2, ReadByte(reader));
    EXPECT_EQ(16, reader.Seek(16, soBeginning));
    EXPECT_EQ(32, source.GetPosition());
    EXPECT_EQ(16, ReadByte(reader));
}

TEST(BufferedReadStream, CountsFromItsCreationWhenRelative) {
    TMemoryStream source(CountingBytes(50));
    source.SetPosition(20);
    TZmBufferedReadStream reader(&source, 8, true);
    EXPECT_EQ(0, reader.GetPosition());
    EXPECT_EQ(4, reader.Seek(4, soBeginning));
    EXPECT_EQ(24, ReadByte(reader));
    EXPECT_EQ(29, reader.Seek(-1, soEnd));
    EXPECT_EQ(30, reader.GetSize());
    EXPECT_EQ(50, TZmBufferedReadStream(&source, 8, false).GetSize());
}

TEST(BufferedReadStream, ForwardsWithoutABuffer) {
    TMemoryStream source(CountingBytes(10));
    {
        TZmBufferedReadStream reader(&source, 0, true);
        EXPECT_EQ(0, ReadByte(reader));
        EXPECT_EQ(7, reader.Seek(7, soBeginning));
        EXPECT_EQ(7, ReadByte(reader));
    }
    EXPECT_EQ(8, source.GetPosition());
}

TEST(BufferedReadStream, BearsSourcesThatGiveLittleOrEndEarly) {
    TMeanStream whole(100);
    TZmBufferedReadStream reader(&whole, 16, false);
    std::vector<std::uint8_t> got(100);
    EXPECT_EQ(100, reader.Read(got.data(), 100));
    EXPECT_EQ(CountingBytes(100), got);

    TMeanStream cut(40);
    TZmBufferedReadStream cut_reader(&cut, 16, false);
    EXPECT_EQ(40, cut_reader.Read(got.data(), 100));
    EXPECT_TRUE(cut_reader.GetOverPosition());
    EXPECT_EQ(0, cut_reader.Read(got.data(), 1));
}

TEST(BufferedStreams, RefuseTheOtherDirection) {
    TMemoryStream stream(CountingBytes(4));
    TZmBufferedReadStream reader(&stream, 4, false);
    TZmBufferedWriteStream writer(&stream, 4);
    std::uint8_t byte = 0;
    EXPECT_EQ("TZmBufferedReadStream cannot write!",
              test::MessageOf([&] { reader.Write(&byte, 1); }));
    EXPECT_EQ("TZmBufferedWriteStream cannot read!",
              test::MessageOf([&] { writer.Read(&byte, 1); }));
}

TEST(BufferedWriteStream, FlushesFullBlocksOnSeekAndAtTheEnd) {
    const std::vector<std::uint8_t> bytes = CountingBytes(30);
    TRecordingStream target;
    {
        TZmBufferedWriteStream writer(&target, 8);
        EXPECT_EQ(0, writer.Write(bytes.data(), 0));
        EXPECT_EQ(5, writer.Write(bytes.data(), 5));
        EXPECT_TRUE(target.writes.empty());
        EXPECT_EQ(20, writer.Write(bytes.data() + 5, 20));
        EXPECT_EQ((std::vector<std::int32_t>{8, 8, 8}), target.writes);
        EXPECT_EQ(25, writer.GetPosition());  // a seek to the present position forces data out
        EXPECT_EQ((std::vector<std::int32_t>{8, 8, 8, 1}), target.writes);
        EXPECT_EQ(5, writer.Write(bytes.data() + 25, 5));
    }
    EXPECT_EQ(bytes, target.Bytes());
}

TEST(BufferedWriteStream, TellsThatTheTargetIsFull) {
    const std::vector<std::uint8_t> bytes = CountingBytes(30);
    TRecordingStream target;
    target.room = 10;
    TZmBufferedWriteStream writer(&target, 8);
    EXPECT_EQ(8, writer.Write(bytes.data(), 8));
    EXPECT_FALSE(writer.HasFailed());
    EXPECT_LT(writer.Write(bytes.data() + 8, 20), 20);
    EXPECT_TRUE(writer.HasFailed());
    EXPECT_EQ(0, writer.Write(bytes.data(), 1));
}

TEST(StreamProvider, ForwardsAndStaysSilent) {
    TMemoryStream stream(std::vector<std::uint8_t>{10, 20, 30});
    TZmVCLStreamProvider provider(&stream);
    EXPECT_EQ(3, provider.size());
    EXPECT_EQ(10, provider.silent_getc());
    EXPECT_EQ(2, provider.seek(1, 1));
    EXPECT_EQ(30, provider.silent_getc());
    EXPECT_TRUE(provider.eof());
    EXPECT_EQ(-1, provider.silent_getc());
    EXPECT_EQ(1, provider.seek(-2, 2));
    EXPECT_EQ(1, provider.silent_write("x", 1));
    EXPECT_EQ(2, provider.seek(9, 3));  // no such origin
    EXPECT_EQ(0, provider.seek(0, 0));
    EXPECT_EQ(0, provider.tell());
    TZmBufferedWriteStream raising(&stream, 16);
    TZmVCLStreamProvider silent(&raising);
    std::uint8_t byte = 0;
    EXPECT_EQ(0, silent.silent_read(&byte, 1));
    EXPECT_EQ(-1, silent.silent_getc());
}

}  // namespace
}  // namespace zm
