#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "engine/foundation/zmstreams.h"
#include "engine/io/zmioparams.h"
#include "engine/metadata/zmiptc.h"
#include "engine/metadata/zmmarkers.h"

namespace zm {
namespace {

using TBytes = std::vector<std::uint8_t>;

TBytes Rest(const TBytes& bytes, std::size_t from) {
    return {bytes.begin() + static_cast<std::ptrdiff_t>(from), bytes.end()};
}

TEST(MarkerList, StreamFormByteByByte) {
    TZmMarkerList list;
    list.AddMarker(0xFE, TBytes{7, 8});
    list.AddMarker(0xE1, TBytes{});
    TMemoryStream stream;
    list.SaveToStream(stream);
    const TBytes expected{0,                       // form
                          2,    0, 0, 0,           // count
                          0xFE, 2, 0, 0, 0, 7, 8,  // type, length, data
                          0xE1, 0, 0, 0, 0};
    EXPECT_EQ(expected, stream.Bytes());
    stream.SetPosition(0);
    TZmMarkerList loaded;
    loaded.AddMarker(1, TBytes{1});
    EXPECT_TRUE(loaded.LoadFromStream(stream));
    ASSERT_EQ(2, loaded.Count());
    EXPECT_EQ(0xFE, loaded.GetMarkerType(0));
    EXPECT_EQ(2, loaded.GetMarkerStream(0)->GetSize());
    EXPECT_EQ(0, loaded.GetMarkerLength(1));

    for (std::size_t size = 0; size < expected.size(); ++size) {
        TBorrowedMemoryStream cut(expected.data(), static_cast<std::int64_t>(size));
        EXPECT_FALSE(loaded.LoadFromStream(cut)) << size;
        EXPECT_LT(loaded.Count(), 2) << size;
    }
    const TBytes other_form{1, 0, 0, 0, 0};
    TBorrowedMemoryStream other(other_form.data(), 5);
    EXPECT_FALSE(loaded.LoadFromStream(other));
}

TEST(IPTCList, KeepsOrderAndBearsIndicesOutside) {
    TZmIPTCInfoList list;
    EXPECT_EQ(0, list.AddStringItem(2, 5, "title"));
    EXPECT_EQ(1, list.AddBufferItem(2, 25, TBytes{1, 2}));
    list.InsertStringItem(0, 1, 90, "first");
    list.InsertStringItem(99, 2, 25, "last");
    EXPECT_EQ(2, list.IndexOf(2, 25));
    EXPECT_EQ(-1, list.IndexOf(2, 26));
    EXPECT_EQ("last", list.GetStrings(3));
    list.SetStrings(1, "new");
    list.SetRecordNumber(1, 3);
    list.SetDataSet(1, 6);
    EXPECT_EQ(1, list.IndexOf(3, 6));
    EXPECT_EQ(3, list.GetItemLength(1));
    list.DeleteItem(0);
    list.DeleteItem(-1);
    list.SetStrings(9, "x");
    EXPECT_EQ(3, list.Count());
    EXPECT_EQ("", list.GetStrings(3));
    EXPECT_EQ(0, list.GetDataSet(-1));
    EXPECT_EQ(0, list.GetRecordNumber(3));
}

TEST(IPTCList, FieldsOfTheParameters) {
    TIOParams params;
    params.SetIPTC_Photoshop(105, "headline");
    params.WriteIPTCField(2, 105, "other");
    EXPECT_EQ(1, params.fIPTC_Info.Count());
    EXPECT_EQ("other", params.GetIPTC_Photoshop(105));
    TIOParams copy;
    copy.Assign(params);
    params.ClearIPTCField(2, 105);
    EXPECT_EQ("", params.ReadIPTCField(2, 105));
    EXPECT_TRUE(copy.ContainsInfo().Contains(zmrIPTC));
    copy.ResetInfo(TZmMetaInfoItems(zmrIPTC));
    EXPECT_EQ(0, copy.fIPTC_Info.Count());
}

TEST(IPTCList, BareBlockByteByByte) {
    TZmIPTCInfoList list;
    list.AddStringItem(2, 0, "xx");  // the version is written anyway
    list.AddStringItem(2, 5, "abc");
    list.AddStringItem(2, 6, "");
    const TBytes expected{0x1C, 2, 0, 0, 2, 0, 2, 0x1C, 2, 5, 0, 3, 'a', 'b', 'c', 0};
    TBytes bytes = list.SaveToStandardBuffer(/*with_resource_header=*/false);
    EXPECT_EQ(expected, (bytes.size() % 2 == 0 ? bytes : TBytes()));
    TZmIPTCInfoList loaded;
    EXPECT_TRUE(loaded.LoadFromStandardBuffer(bytes));
    EXPECT_EQ(2, loaded.Count());
    EXPECT_EQ("abc", loaded.GetStrings(1));
    EXPECT_TRUE(TZmIPTCInfoList().SaveToStandardBuffer(true).empty());
}

TEST(IPTCList, ResourceBlockByteByByte) {
    TZmIPTCInfoList list;
    list.AddStringItem(2, 5, "abcd");
    const TBytes bytes = list.SaveToStandardBuffer(/*with_resource_header=*/true);
    const TBytes expected{
        'P',  'h', 'o', 't', 'o', 's', 'h', 'o', 'p', ' ', '3', '.', '0',
        0,    '8', 'B', 'I', 'M', 4,   4,   0,   0,   0,   0,   0,   9,  // without the pad byte
        0x1C, 2,   5,   0,   4,   'a', 'b', 'c', 'd',                    //
        0};
    EXPECT_EQ(expected, bytes);
    TZmIPTCInfoList loaded;
    EXPECT_TRUE(loaded.LoadFromStandardBuffer(bytes));
    EXPECT_EQ("abcd", loaded.GetStrings(0));
    TBytes other = expected;
    other[19] = 5;  // another resource
    EXPECT_FALSE(loaded.LoadFromStandardBuffer(other));
    EXPECT_EQ(0, loaded.Count());
    EXPECT_FALSE(loaded.LoadFromStandardBuffer({}));
}

TEST(IPTCList, LongItemsAndDamage) {
    TZmIPTCInfoList list;
    list.AddBufferItem(2, 202, TBytes(40000, 9));
    const TBytes bytes = list.SaveToStandardBuffer(false);
    EXPECT_EQ((TBytes{0x1C, 2, 202, 0, 4, 0, 0, 0x9C, 0x40, 9}),
              TBytes(bytes.begin() + 7, bytes.begin() + 17));
    // The form with the top bit set: two bytes that hold the length 3.
    const TBytes extended{0x1C, 2, 5, 0x80, 2, 0, 3, 'a', 'b', 'c', 0x1C, 2, 6, 0, 1, 'z'};
    TZmIPTCInfoList loaded;
    EXPECT_TRUE(loaded.LoadFromStandardBuffer(extended));
    ASSERT_EQ(2, loaded.Count());
    EXPECT_EQ("abc", loaded.GetStrings(0));
    EXPECT_TRUE(loaded.LoadFromStandardBuffer(TBytes(extended.begin(), extended.end() - 1)));
    EXPECT_EQ(1, loaded.Count());  // the second runs past the end
    const TBytes absurd{0x1C, 2, 5, 0xFF, 0xFF, 0, 3, 'a'};
    EXPECT_FALSE(loaded.LoadFromStandardBuffer(absurd));
    EXPECT_TRUE(loaded.LoadFromStandardBuffer(Rest(TBytes{1, 2, 0x1C, 2, 5, 0, 1, 'q'}, 0)));
    EXPECT_EQ("q", loaded.GetStrings(0));
}

TEST(IPTCList, StreamFormByteByByte) {
    TZmIPTCInfoList list;
    list.AddStringItem(2, 5, "ab");
    TMemoryStream stream;
    list.SaveToStream(stream);
    const TBytes expected{1, 0, 0, 0, 2, 5, 2, 0, 0, 0, 'a', 'b'};
    EXPECT_EQ(expected, stream.Bytes());
    stream.SetPosition(0);
    TZmIPTCInfoList loaded;
    EXPECT_TRUE(loaded.LoadFromStream(stream));
    EXPECT_EQ("ab", loaded.GetStrings(loaded.IndexOf(2, 5)));
    TBorrowedMemoryStream cut(expected.data(), 11);
    EXPECT_FALSE(loaded.LoadFromStream(cut));
    EXPECT_EQ(0, loaded.Count());
}

}  // namespace
}  // namespace zm
