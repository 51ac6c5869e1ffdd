#include "engine/foundation/zmutils_dictionaryparser.h"

#include <gtest/gtest.h>

#include <string>

#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

struct TCase {
    const char* text;
    bool accepted;
    const char* dump;  // as JSON
};

void ExpectParsed(const TCase& expected) {
    TZmDictionary dictionary;
    dictionary.Insert(u"earlier", 1);
    EXPECT_EQ(dictionary.Parse(Utf16FromUtf8(expected.text)), expected.accepted) << expected.text;
    EXPECT_EQ(Utf8FromUtf16(dictionary.Dump()), expected.dump) << expected.text;
}

TEST(DictionaryJson, Values) {
    const TCase cases[] = {
        {"{}", true, "{}"},
        {" \r\n\b{ \"a\" : 1 } ", true, R"({"a":1})"},
        {R"({"a":-12,"b":"x","c":true,"d":false})", true,
         R"({"a":-12,"b":"x","c":true,"d":false})"},
        {R"({"a":1.5e3})", true, R"({"a":1500.0})"},
        {R"({"a":15e3})", true, R"({"a":0})"},
        {R"({"a":null,"b":True,"c":0x10,"d":2147483648,"e":'q'})", true,
         R"({"a":0,"b":0,"c":0,"d":0,"e":0})"},
        {R"({"a":1.2.3,"b":x.y})", true, R"({"a":0.0,"b":0.0})"},
        {R"({'a':1})", true, R"({"a":1})"},
        {R"({"a":[1,"b",{"c":[]},[2.5]]})", true, R"({"a":[1,"b",{"c":[]},[2.5]]})"},
        {R"({"a":{"b":{}}})", true, R"({"a":{"b":{}}})"},
        {"{\"a\":\"\xC3\xA4\xE2\x82\xAC\xF0\x9F\x98\x80\"}", true,
         "{\"a\":\"\xC3\xA4\xE2\x82\xAC\xF0\x9F\x98\x80\"}"},
        {"{\"a\":1} what follows", true, R"({"a":1})"},
        {R"({"a":1,})", true, R"({"a":1})"}};
    for (const TCase& one : cases) {
        ExpectParsed(one);
    }
}

TEST(DictionaryJson, RepeatedKeysAreGathered) {
    ExpectParsed({R"({"a":1,"a":2})", true, R"({"a":[1,2]})"});
    ExpectParsed({R"({"a":1,"A":"x","a":2.5})", true, R"({"a":[1,"x",2.5]})"});
    ExpectParsed({R"({"a":[1],"a":[2,3],"a":4})", true, R"({"a":[1,[2,3],4]})"});
}

TEST(DictionaryJson, QuotedTextsKnowOneEscape) {
    TZmDictionary d;
    ASSERT_TRUE(d.Parse(uR"({"a":"a\"b","b":"\n\u0041\\x","c":"'"})"));
    EXPECT_EQ(d.GetString(u"a"), u"a\"b");
    EXPECT_EQ(d.GetString(u"b"), u"\\n\\u0041\\\\x");
    EXPECT_EQ(d.GetString(u"c"), u"'");
    EXPECT_EQ(d.Dump(), uR"({"a":"a\"b","b":"\n\u0041\\x","c":"'"})");
    // A backslash keeps the quote inside even when another stands before it.
    EXPECT_FALSE(d.Parse(uR"({"a":"x\\","b":"y"})"));
    ASSERT_TRUE(d.Parse(uR"({"a":"x\\","})"));
    EXPECT_EQ(d.GetString(u"a"), uR"(x\",)");
}

TEST(DictionaryJson, ErrorsKeepWhatCameBefore) {
    const TCase cases[] = {{"", false, "{}"},
                           {"abc", false, "{}"},
                           {"[1]", false, "{}"},
                           {"{", false, "{}"},
                           {R"({"a":1)", false, R"({"a":1})"},
                           {R"({"a":1;"b":2})", false, R"({"a":0})"},
                           {R"({"a":1 "b":2})", false, R"({"a":1})"},
                           {R"({"a" 1})", false, "{}"},
                           {R"({a:1})", false, "{}"},
                           {R"({"a":})", false, "{}"},
                           {R"({"a":1,"b":"open})", false, R"({"a":1})"},
                           {R"({"a":1,,})", false, R"({"a":1})"},
                           {R"({"a":{"b":1,"c"}})", false, R"({"a":{"b":1}})"},
                           {R"({"a":[1,{"b":2,}},3]})", false, R"({"a":[1,{"b":2}]})"},
                           {R"({"a":[1,{"b":2,"c"},3]})", false, R"({"a":[1]})"},
                           {R"({"a":[1,]})", false, R"({"a":[1]})"},
                           {R"({"a":[1,2)", false, R"({"a":[1,2]})"},
                           {R"({"a":[1}})", false, R"({"a":[1]})"}};
    for (const TCase& one : cases) {
        ExpectParsed(one);
    }
}

TEST(DictionaryJson, ATabBetweenTokensIsAnErrorAndStaysInAWord) {
    for (const char* const text :
         {"\t{}", "{\t}", "{\t\"a\":1}", "{\"a\"\t:1}", "{\"a\":\t1}", "{\"a\":\t\"x\"}",
          "{\"a\":1,\t\"b\":2}", "{\"a\":[1,\t2]}", "{\"a\":\"x\"\t}"}) {
        TZmDictionary d;
        EXPECT_FALSE(d.Parse(Utf16FromUtf8(text))) << text;
    }
    ExpectParsed({"{\"a\":1\t,\"b\":tr\tue}", true, R"({"a":0,"b":0})"});
    ExpectParsed({"{\"a\":\"x\ty\"}", true, "{\"a\":\"x\ty\"}"});
    TZmDictionary d;
    ASSERT_TRUE(d.Parse(u"<a \tb='1'/>"));
    EXPECT_EQ(d.GetDictionary(u"a")->GetString(u"\tb"), u"1");
}

TEST(DictionaryXml, Elements) {
    const TCase cases[] = {
        {"<a/>", true, R"({"a":{}})"},
        {"<a b='1' c=\"x'y\" />", true, R"({"a":{"b":"1","c":"x'y"}})"},
        {"<a></a>", true, R"({"a":{"#content":{}}})"},
        {"<a> \t hi there\n</a>", true, R"({"a":{"#content":{"#text":"hi there"}}})"},
        {"<a b='1'>t<c/>u</a >", true, R"({"a":{"b":"1","#content":{"c":{},"#text":["t","u"]}}})"},
        {"<a/><a/><b/><a c='1'/>", true, R"({"a":[{},{},{"c":"1"}],"b":{}})"},
        {"<?xml version='1.0'?>\n<r/>", true, R"({"r":{},"xml":{"version":"1.0"}})"},
        {"<a><b></c></a>", true, R"({"a":{"#content":{"b":{"#content":{}}}}})"},
        {"<a b='x\\'y'/>", true, R"({"a":{"b":"x\'y"}})"},
        {"<x:a x:b='1'/> tail", true, R"({"x:a":{"x:b":"1"},"#text":"tail"})"}};
    for (const TCase& one : cases) {
        TZmDictionary expected;
        ASSERT_TRUE(expected.Parse(Utf16FromUtf8(one.dump))) << one.dump;
        ExpectParsed({one.text, one.accepted, Utf8FromUtf16(expected.Dump()).c_str()});
    }
}

TEST(DictionaryXml, ErrorsKeepWhatCameBefore) {
    const TCase cases[] = {{"<", false, "{}"},
                           {"<>", false, "{}"},
                           {"</a>", false, "{}"},
                           {"<a", false, R"({"a":{}})"},
                           {"<a b>", false, R"({"a":{}})"},
                           {"<a b=1>", false, R"({"a":{}})"},
                           {"<a b='1", false, R"({"a":{}})"},
                           {"<a b='1' ?>", false, R"({"a":{"b":"1"}})"},
                           {"<a/ b>", false, R"({"a":{}})"},
                           {"<?a b='1'>", false, R"({"a":{"b":"1"}})"},
                           {"<?a b='1'/>", false, R"({"a":{"b":"1"}})"},
                           {"<a>text", false, R"({"a":{"#content":{"#text":"text"}}})"},
                           {"<a>text</a", false, R"({"a":{"#content":{"#text":"text"}}})"},
                           {"<a/></a><b/>", false, R"({"a":{}})"},
                           {"<!-- no comments --><b/>", false, R"({"!--":{}})"}};
    for (const TCase& one : cases) {
        ExpectParsed(one);
    }
}

std::u16string Repeated(std::u16string_view text, int count) {
    std::u16string result;
    for (int i = 0; i < count; ++i) {
        result += text;
    }
    return result;
}

TEST(DictionaryDepth, NestingIsLimited) {
    const auto objects = [](int levels) {
        return Repeated(u"{\"a\":", levels - 1) + u"{" + Repeated(u"}", levels);
    };
    const auto elements = [](int levels) {
        return Repeated(u"<a>", levels) + Repeated(u"</a>", levels);
    };
    const auto lists = [](int levels) {
        return u"{\"a\":" + Repeated(u"[", levels) + Repeated(u"]", levels) + u"}";
    };
    TZmDictionary d;
    EXPECT_TRUE(d.Parse(objects(512)));
    EXPECT_EQ(d.Dump(), objects(512));
    EXPECT_FALSE(d.Parse(objects(513)));
    EXPECT_TRUE(d.Parse(lists(511)));
    EXPECT_FALSE(d.Parse(lists(512)));
    EXPECT_TRUE(d.Parse(elements(250)));
    EXPECT_FALSE(d.Parse(elements(251)));
    // The deepest XML inside another dictionary reads back from its JSON text.
    auto packet = std::make_unique<TZmDictionary>();
    ASSERT_TRUE(packet->Parse(elements(250)));
    TZmDictionary around;
    around.Insert(u"XMP", std::move(packet));
    EXPECT_TRUE(d.Parse(around.Dump()));
    EXPECT_EQ(d.Dump(), around.Dump());
    EXPECT_FALSE(d.Parse(Repeated(u"{\"a\":", 1000000)));
    EXPECT_FALSE(d.Parse(Repeated(u"<a>", 1000000)));
}

}  // namespace
}  // namespace zm
