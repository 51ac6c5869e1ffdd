#include "engine/foundation/zmutils_hashstream.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/platform/hashing.h"
#include "tests/support/testfiles.h"
#include "tests/support/testmessage.h"

namespace zm {
namespace {

using test::MessageOf;

constexpr char kAbc[] = "abc";
constexpr char kMD5OfAbc[] = "900150983cd24fb0d6963f7d28e17f72";
constexpr char kMD5OfNothing[] = "d41d8cd98f00b204e9800998ecf8427e";

class HashStream : public testing::Test {
protected:
    void SetUp() override {
        platform::THashFailure failure = platform::hfNone;
        platform::CreateHash(zmhaMD5, failure);
        if (failure == platform::hfNoProvider) {
            GTEST_SKIP() << "this machine has no library for hashes";
        }
    }
};

TEST_F(HashStream, GivesThePublishedHashes) {
    const std::pair<std::uint32_t, const char*> hashes[] = {
        {0x8003, kMD5OfAbc},
        {0x8004, "a9993e364706816aba3e25717850c26c9cd0d89d"},
        {0x800C, "ba7816bf8f01cfea414140de5dae2223b00361a396177a9cb410ff61f20015ad"},
        {0x800D,
         "cb00753f45a35e8bb5a03d699ac65007272c32ab0eded1631a8b605a43ff5bed"
         "8086072ba1e7cc2358baeca134c825a7"},
        {0x800E,
         "ddaf35a193617abacc417349ae20413112e6fa4e89a97ea20a9eeee64b55d39a"
         "2192992a274fc1a836ba3c23a3feebbd454d4423643ce80e2a9ac94fa54ca49f"},
    };
    for (const auto& [algorithm, expected] : hashes) {
        for (const bool buffered : {false, true}) {
            TZmHashStream stream(algorithm, buffered);
            EXPECT_EQ(stream.Write(kAbc, 1), 1);
            EXPECT_EQ(stream.Write(kAbc + 1, 0), 0);
            EXPECT_EQ(stream.Write(kAbc + 1, 2), 2);
            EXPECT_EQ(stream.GetHash(), expected) << buffered;
            EXPECT_EQ(stream.GetHash(), expected) << "asked again";
        }
    }
    EXPECT_EQ(TZmHashStream(zmhaMD5, /*Buffered=*/false).GetHash(), kMD5OfNothing);
    EXPECT_EQ(TZmHashStream(zmhaMD5, /*Buffered=*/true).GetHash(), kMD5OfNothing);
    EXPECT_EQ(MessageOf([] { TZmHashStream stream(0x12345678); }), "Unable to create Crypto Hash");
}

TEST_F(HashStream, ABufferedStreamIsAMemoryStream) {
    TZmHashStream stream(zmhaMD5, /*Buffered=*/true);
    stream.WriteBuffer("xbc", 3);
    EXPECT_NE(stream.GetHash(), kMD5OfAbc);
    stream.SetPosition(0);
    stream.WriteBuffer(kAbc, 1);
    EXPECT_EQ(stream.GetHash(), kMD5OfAbc) << "the bytes as they stand";
    char text[4] = {};
    EXPECT_EQ(stream.Seek(-2, soEnd), 1);
    EXPECT_EQ(stream.Read(text, 4), 2);
    EXPECT_STREQ(text, "bc");
}

TEST_F(HashStream, AnUnbufferedStreamKeepsNothing) {
    const std::string refusal =
        "Read error. Hash stream not Buffered, please create Buffered stream.";
    TZmHashStream stream(zmhaMD5, /*Buffered=*/false);
    TMemoryStream target;
    char byte = 0;
    stream.WriteBuffer(kAbc, 3);
    EXPECT_EQ(stream.GetPosition(), 3);
    EXPECT_EQ(stream.Seek(0, soBeginning), 3);
    EXPECT_EQ(MessageOf([&] { stream.Read(&byte, 1); }), refusal);
    EXPECT_EQ(MessageOf([&] { stream.SaveToStream(target); }), refusal);
    EXPECT_EQ(stream.GetHash(), kMD5OfAbc);
    EXPECT_EQ(MessageOf([&] { stream.Write(kAbc, 1); }), "Unable to add hash data");
}

TEST_F(HashStream, LoadsAndSavesWhole) {
    const test::TempFolder folder;
    test::WriteFileBytes(folder.File("abc"), {'a', 'b', 'c'});
    for (const bool buffered : {false, true}) {
        TZmHashStream stream(zmhaMD5, buffered);
        stream.LoadFromFile(folder.Name("abc"));
        EXPECT_EQ(stream.GetHash(), kMD5OfAbc);
    }
    TZmHashStream stream(zmhaMD5);
    stream.WriteBuffer("dropped by the load", 19);
    TMemoryStream source(std::vector<std::uint8_t>(200000, 'a'));
    source.SetPosition(77);
    stream.LoadFromStream(source);
    EXPECT_EQ(stream.GetPosition(), 0);
    EXPECT_EQ(stream.GetSize(), 200000) << "from the source's beginning";
    stream.SaveToFile(folder.Name("saved"));
    EXPECT_EQ(test::ReadFileBytes(folder.File("saved")), source.Bytes());
    EXPECT_THROW(stream.LoadFromFile(folder.Name("missing")), EFOpenError);
}

}  // namespace
}  // namespace zm
