#include "engine/foundation/zmutils_dictionary.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstrings.h"
#include "tests/support/testmessage.h"

namespace zm {
namespace {

using test::MessageOf;

std::string DumpText(const TZmDictionary& dictionary, TZmDictionaryParserLang lang = zmplJSON) {
    return Utf8FromUtf16(dictionary.Dump(lang));
}

std::uint32_t OneBucket(std::u16string_view, std::uint32_t) {
    return 4711;
}

TEST(DictionaryHash, ElfOverSixteenBitCharacters) {
    EXPECT_EQ(ZmStrHash(u"", 103), 0u);
    EXPECT_EQ(ZmStrHash(u"a", 103), 97u);
    EXPECT_EQ(ZmStrHash(u"ab", 103), 2u) << "97 * 16 + 98 = 1650";
    EXPECT_EQ(ZmStrHash(u"\x20AC", 103), 21u) << "8364";
    // Seven characters: the top four bits 6 come back at bit 4 and are cleared above.
    EXPECT_EQ(ZmStrHash(u"abcdefg", 0xFFFFFFFF), 126462887u);
    // A published value of the 8-bit hash, the same for characters below 128.
    EXPECT_EQ(ZmStrHash(u"jdfgsdhfsdfsd 6445dsfsd7fg/*/+bfjsdgf%$^", 0xFFFFFFFF), 248446350u);
}

TEST(Dictionary, EntriesComeByBucketAndThenByInsertion) {
    TZmDictionary dictionary;
    dictionary.Insert(u"height", 3);  // bucket 64
    dictionary.Insert(u"Width", 2);   // bucket 47, that of "width"
    dictionary.Insert(u"xmp", 1);     // bucket 28
    EXPECT_EQ(DumpText(dictionary), R"({"xmp":1,"Width":2,"height":3})");
    TZmDictionary chained(103, OneBucket, /*caseSensitive=*/false);
    for (const char16_t* const key : {u"q", u"b", u"z", u"a"}) {
        chained.Insert(key, 0);
    }
    chained.Insert(u"B", 5);
    EXPECT_EQ(DumpText(chained), R"({"q":0,"b":5,"z":0,"a":0})") << "a replaced value stays";
}

TEST(Dictionary, KeysAreFoldedUnlessCaseCounts) {
    TZmDictionary folded;
    folded.Insert(u"K\x00C4se", u"x");
    EXPECT_TRUE(folded.HasKey(u"k\x00E4SE"));
    folded.Insert(u"k\x00E4se", 7);
    EXPECT_EQ(folded.GetCount(), 1);
    TZmDictionary exact(103, /*caseSensitive=*/true);
    exact.Insert(u"Key", 1);
    exact.Insert(u"key", 2);
    EXPECT_EQ(exact.GetInteger(u"Key"), 1);
    EXPECT_EQ(exact.GetInteger(u"key"), 2);
    EXPECT_FALSE(exact.HasKey(u"KEY"));
    TZmDictionary no_buckets(0);
    no_buckets.Insert(u"a", 1);
    EXPECT_EQ(no_buckets.GetInteger(u"a"), 1);
}

TEST(Dictionary, ValueKindsAndTheirText) {
    TZmDictionary dictionary;
    const auto dump_of = [&](auto value) {
        dictionary.Clear();
        dictionary.Insert(u"v", std::move(value));
        return DumpText(dictionary);
    };
    EXPECT_EQ(dump_of(u"a\"b\\c\n"), "{\"v\":\"a\\\"b\\c\n\"}");
    EXPECT_EQ(dump_of(INT32_MIN), R"({"v":-2147483648})");
    EXPECT_EQ(dump_of(true), R"({"v":true})");
    EXPECT_EQ(dump_of(1.5), R"({"v":1.5})");
    EXPECT_EQ(dump_of(-2.0), R"({"v":-2.0})") << "the point tells it from an integer";
    EXPECT_EQ(dump_of(1e300), R"({"v":1.0e+300})");
    EXPECT_EQ(dump_of(0.1 + 0.2), R"({"v":0.30000000000000004})");
    EXPECT_EQ(dump_of(1.0 / 0.0), R"({"v":0.0})");
    EXPECT_EQ(dump_of(std::make_unique<TZmDictionary>()), R"({"v":{}})");
    EXPECT_EQ(dump_of(std::make_unique<TObjectList>()), R"({"v":[]})");
    dictionary.Clear();
    EXPECT_EQ(DumpText(dictionary), "{}");
    EXPECT_TRUE(dictionary.IsEmpty());
}

/// A value of another room.
class TStranger : public TObject {
public:
    explicit TStranger(int& alive) : alive_(alive) { ++alive_; }
    ~TStranger() override { --alive_; }
    std::string ClassName() const override { return "TStranger"; }
    std::unique_ptr<TObject> Clone() const override { return std::make_unique<TStranger>(alive_); }

private:
    int& alive_;
};

TEST(Dictionary, OwnsItsValues) {
    int alive = 0;
    TZmDictionary dictionary;
    dictionary.Insert(u"a", std::make_unique<TStranger>(alive));
    EXPECT_EQ(DumpText(dictionary), R"({"a":TStranger})");
    dictionary.Insert(u"A", std::make_unique<TStranger>(alive));
    EXPECT_EQ(alive, 1) << "the replaced one is freed";
    TZmDictionary copy(7, /*caseSensitive=*/true);
    copy.Insert(u"old", 1);
    copy.Assign(dictionary);
    copy.Assign(copy);
    EXPECT_EQ(alive, 2);
    EXPECT_TRUE(copy.HasKey(u"A")) << "keys without case, as in the source";
    EXPECT_FALSE(copy.HasKey(u"old"));
    EXPECT_EQ(dictionary.Erase(u"a", /*freeValue=*/true), nullptr);
    EXPECT_EQ(alive, 1);
    const auto kept = copy.Erase(u"a", /*freeValue=*/false);
    EXPECT_NE(kept, nullptr);
    EXPECT_EQ(alive, 1);
    EXPECT_TRUE(copy.IsEmpty());
    EXPECT_EQ(copy.Erase(u"a"), nullptr);
}

TEST(Dictionary, GettersTakeTheStatedKindsOnly) {
    TZmDictionary d;
    ASSERT_TRUE(
        d.Parse(uR"({"i":42,"d":2.5,"b":true,"s":"7","t":"true","l":[1],
        "e":{"#text":"12"},"c":{"#content":{"#text":"3.5"}},"u":{"#text":"true"},"n":{}})"));
    EXPECT_EQ(d.GetString(u"s"), u"7");
    EXPECT_EQ(d.GetString(u"e"), u"12");
    EXPECT_EQ(d.GetString(u"c"), u"3.5");
    EXPECT_EQ(d.GetInteger(u"i"), 42);
    EXPECT_EQ(d.GetInteger(u"e"), 12);
    EXPECT_EQ(d.GetDouble(u"d"), 2.5);
    EXPECT_EQ(d.GetDouble(u"i"), 42.0);
    EXPECT_EQ(d.GetDouble(u"c"), 3.5);
    EXPECT_TRUE(d.GetBoolean(u"b"));
    EXPECT_TRUE(d.GetBoolean(u"t"));
    EXPECT_TRUE(d.GetBoolean(u"u"));
    EXPECT_FALSE(d.GetBoolean(u"s"));
    EXPECT_FALSE(d.GetBoolean(u"i"));
    EXPECT_EQ(d.GetDictionary(u"c")->GetCount(), 1);
    EXPECT_EQ(d.GetList(u"l")->GetCount(), 1);
    for (const char16_t* const key : {u"s", u"c", u"n", u"l", u"d"}) {
        EXPECT_EQ(MessageOf([&] { d.GetInteger(key); }), "Not integer value");
    }
    EXPECT_EQ(MessageOf([&] { d.GetDouble(u"s"); }), "Not double value");
    EXPECT_EQ(MessageOf([&] { d.GetString(u"i"); }), "Not string value");
    EXPECT_EQ(MessageOf([&] { d.GetString(u"n"); }), "Key \"#text\" not found");
    EXPECT_EQ(MessageOf([&] { d.GetDictionary(u"l"); }), "Not dictionary value");
    EXPECT_EQ(MessageOf([&] { d.GetList(u"n"); }), "Not list value");
}

TEST(Dictionary, AMissingKeyRaisesUnlessSilent) {
    const TZmDictionary dictionary;
    const std::u16string key = u"gr\x00F6\x00DF!";
    const std::string message = "Key \"gr\xC3\xB6\xC3\x9F!\" not found";
    EXPECT_EQ(MessageOf([&] { dictionary.Get(key); }), message);
    EXPECT_EQ(MessageOf([&] { dictionary.GetInteger(key); }), message);
    EXPECT_EQ(dictionary.Get(key, /*silent=*/true), nullptr);
}

TEST(Dictionary, RecursionSearchesDictionariesThisLevelFirst) {
    TZmDictionary d;
    ASSERT_TRUE(d.Parse(uR"({"a":{"x":1,"b":{"y":2}},"x":3,"l":[{"z":4}]})"));
    EXPECT_EQ(d.GetInteger(u"x", /*recursive=*/true), 3);
    EXPECT_EQ(d.GetInteger(u"Y", /*recursive=*/true), 2);
    EXPECT_FALSE(d.HasKey(u"y"));
    EXPECT_TRUE(d.HasKey(u"y", /*recursive=*/true));
    EXPECT_FALSE(d.HasKey(u"z", /*recursive=*/true)) << "lists are not searched";
}

TEST(Dictionary, ACursorOutlivesItsEntry) {
    TZmDictionary d(103, OneBucket, /*caseSensitive=*/false);
    for (const char16_t* const key : {u"a", u"b", u"c"}) {
        d.Insert(key, 1);
    }
    TZmStrStrEnumerator cursor;
    std::u16string seen;
    while (d.GetNext(cursor)) {
        seen += cursor.Key();
        d.Erase(std::u16string(cursor.Key()));
    }
    EXPECT_EQ(seen, u"abc");
    EXPECT_TRUE(d.IsEmpty());
}

TEST(Dictionary, DumpsAsXmlElements) {
    TZmDictionary d;
    ASSERT_TRUE(d.Parse(uR"({"xmp":{"a":"<\"1\""},"width":[1,"two",[true]],"height":2.5})"));
    EXPECT_EQ(DumpText(d, zmplXML),
              "<xmp><a><\"1\"</a></xmp><width>1twotrue</width><height>2.5</height>");
}

TEST(NeutralNumbers, AcceptedTexts) {
    const std::pair<const char16_t*, std::optional<double>> cases[] = {
        {u"1.5e3", 1500.0},          {u"-.5", -0.5},           {u"+2.", 2.0},
        {u"", std::nullopt},         {u"+-1.0", std::nullopt}, {u".", std::nullopt},
        {u"1.2.3", std::nullopt},    {u" 1.0", std::nullopt},  {u"inf", std::nullopt},
        {u"nan.", std::nullopt},     {u"0x1.8", std::nullopt}, {u"1.0e999", std::nullopt},
        {u"\x0131.5", std::nullopt},
    };
    for (const auto& [text, value] : cases) {
        EXPECT_EQ(NeutralTextToDouble(text), value) << Utf8FromUtf16(text);
    }
}

}  // namespace
}  // namespace zm
