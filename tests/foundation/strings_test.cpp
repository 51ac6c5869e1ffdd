#include "engine/foundation/zmstrings.h"

#include <gtest/gtest.h>

#include "engine/platform/files.h"

namespace zm {
namespace {

struct TPair {
    const char* name;
    std::string utf8;
    std::u16string utf16;
};

TEST(Strings, Utf8AndUtf16OfOneTextBelongTogether) {
    const TPair pairs[] = {
        {"empty", "", u""},
        {"one byte", std::string("a\0\x7F", 3), std::u16string(u"a\0\x7F", 3)},
        {"two bytes", "\xC2\x80\xDF\xBF", u"\x0080\x07FF"},
        {"three bytes", "\xE0\xA0\x80\xEF\xBF\xBF", u"\x0800\xFFFF"},
        {"around the surrogates", "\xED\x9F\xBF\xEE\x80\x80", u"\xD7FF\xE000"},
        {"four bytes", "\xF0\x90\x80\x80\xF4\x8F\xBF\xBF", u"\xD800\xDC00\xDBFF\xDFFF"}};
    for (const TPair& pair : pairs) {
        EXPECT_EQ(Utf16FromUtf8(pair.utf8), pair.utf16) << pair.name;
        EXPECT_EQ(Utf8FromUtf16(pair.utf16), pair.utf8) << pair.name;
    }
}

TEST(Strings, MalformedBytesAreKeptOneByOne) {
    const TPair pairs[] = {
        {"lone continuation, cut short", "a\x80z\xE2\x82", u"a\xDC80z\xDCE2\xDC82"},
        {"cut short before a letter", "\xF0\x9F\x98x", u"\xDCF0\xDC9F\xDC98x"},
        {"overlong slash", "\xC0\xAF", u"\xDCC0\xDCAF"},
        {"overlong in three bytes", "\xE0\x9F\xBF", u"\xDCE0\xDC9F\xDCBF"},
        {"overlong in four bytes", "\xF0\x8F\xBF\xBF", u"\xDCF0\xDC8F\xDCBF\xDCBF"},
        {"surrogate", "\xED\xA0\x80", u"\xDCED\xDCA0\xDC80"},
        {"beyond the last character", "\xF4\x90\x80\x80", u"\xDCF4\xDC90\xDC80\xDC80"},
        {"never valid", "\xFE\xFF", u"\xDCFE\xDCFF"}};
    for (const TPair& pair : pairs) {
        EXPECT_EQ(Utf16FromUtf8(pair.utf8), pair.utf16) << pair.name;
        EXPECT_EQ(Utf8FromUtf16(pair.utf16), pair.utf8) << pair.name;
    }
}

TEST(Strings, EveryPairOfBytesSurvivesTheWayThereAndBack) {
    for (int first = 0; first < 256; ++first) {
        for (int second = 0; second < 256; ++second) {
            const std::string bytes{'\xE2', static_cast<char>(first), static_cast<char>(second)};
            ASSERT_EQ(Utf8FromUtf16(Utf16FromUtf8(bytes)), bytes) << first << " " << second;
        }
    }
}

TEST(Strings, OtherUnpairedSurrogatesTakeThreeBytes) {
    EXPECT_EQ(Utf8FromUtf16(u"\xD800"), "\xED\xA0\x80");
    EXPECT_EQ(Utf8FromUtf16(u"\xD83Dx"), "\xED\xA0\xBDx");
    EXPECT_EQ(Utf8FromUtf16(u"\xDC7F\xDD00"), "\xED\xB1\xBF\xED\xB4\x80");
    EXPECT_EQ(Utf8FromUtf16(u"\xDC80"), "\x80");
}

TEST(Strings, IntegersAsUsersTypeThem) {
    const struct {
        const char16_t* text;
        std::optional<std::int32_t> value;
    } rows[] = {{u"0", 0},
                {u" \t42\t ", 42},
                {u"+7", 7},
                {u"-0012", -12},
                {u"2147483647", 2147483647},
                {u"2147483648", std::nullopt},
                {u"-2147483648", -2147483647 - 1},
                {u"-2147483649", std::nullopt},
                {u"99999999999999999999999999", std::nullopt},
                {u"", std::nullopt},
                {u"  ", std::nullopt},
                {u"-", std::nullopt},
                {u"+-1", std::nullopt},
                {u"- 1", std::nullopt},
                {u"1 2", std::nullopt},
                {u"1.0", std::nullopt},
                {u"0x10", std::nullopt},
                {u"12px", std::nullopt},
                {u"\x0661", std::nullopt},  // an Arabic digit
                {u"1\n", std::nullopt}};
    for (const auto& row : rows) {
        EXPECT_EQ(ParseInteger(std::u16string_view(row.text)), row.value)
            << Utf8FromUtf16(row.text);
        EXPECT_EQ(ParseInteger(std::string_view(Utf8FromUtf16(row.text))), row.value);
    }
    EXPECT_EQ(IntegerToText(INT64_MIN), u"-9223372036854775808");
}

TEST(Strings, KeysFoldTheScriptsTheyAreWrittenIn) {
    EXPECT_TRUE(KeysEqualNoCase(u"Width_10", u"wIDTH_10"));
    EXPECT_TRUE(KeysEqualNoCase(u"\x00C4\x00D6\x00DE", u"\x00E4\x00F6\x00FE"));
    EXPECT_TRUE(KeysEqualNoCase(u"\x0178", u"\x00FF"));
    EXPECT_TRUE(KeysEqualNoCase(u"\x0391\x03A3\x038F", u"\x03B1\x03C2\x03CE"));
    EXPECT_TRUE(KeysEqualNoCase(u"\x0416\x0401\x0490", u"\x0436\x0451\x0491"));
    EXPECT_FALSE(KeysEqualNoCase(u"\x00D7", u"\x00F7"));  // the signs of times and division
    EXPECT_FALSE(KeysEqualNoCase(u"@[", u"`{"));
    EXPECT_FALSE(KeysEqualNoCase(u"\x0491", u"\x0492"));
    EXPECT_FALSE(KeysEqualNoCase(u"a", u"ab"));
    EXPECT_TRUE(AsciiEqualNoCase(u"PnG", u"pNg"));
    EXPECT_FALSE(AsciiEqualNoCase(u"\x00C4", u"\x00E4"));
    EXPECT_EQ(AsciiLower(std::string_view("@AZ[\xC3\x84")), "@az[\xC3\x84");
    EXPECT_EQ(AsciiUpper(std::u16string_view(u"`az{\x00E4")), u"`AZ{\x00E4");
}

TEST(Strings, LinesEndInThreeWaysAndPartsAtSeparators) {
    using TLines = std::vector<std::u16string>;
    EXPECT_EQ(SplitLines(u""), TLines{});
    EXPECT_EQ(SplitLines(u"a\r\nb\nc\rd"), (TLines{u"a", u"b", u"c", u"d"}));
    EXPECT_EQ(SplitLines(u"a\r\n"), TLines{u"a"});
    EXPECT_EQ(SplitLines(u"\n\r\r\n"), (TLines{u"", u"", u""}));
    EXPECT_EQ(SplitLines(u"a\r\n\r"), (TLines{u"a", u""}));
    using TParts = std::vector<std::string>;
    EXPECT_EQ(SplitText("", ';'), TParts{""});
    EXPECT_EQ(SplitText("A;;B;", ';'), (TParts{"A", "", "B", ""}));
}

TEST(Strings, PartsOfFileNames) {
    const struct {
        const char16_t* name;
        const char16_t* folder;
        const char16_t* base;
        const char16_t* extension;
    } rows[] = {{u"", u"", u"", u""},           {u"a.JPG", u"", u"a.JPG", u".JPG"},
                {u"x.y/a", u"x.y/", u"a", u""}, {u"/x/a.tar.gz", u"/x/", u"a.tar.gz", u".gz"},
                {u"x/", u"x/", u"", u""},       {u"x/a.", u"x/", u"a.", u"."}};
    for (const auto& row : rows) {
        EXPECT_EQ(FileFolder(row.name), row.folder);
        EXPECT_EQ(FileBaseName(row.name), row.base);
        EXPECT_EQ(FileExtension(row.name), row.extension);
    }
    const bool back_slash = platform::IsPathSeparator(u'\\');
    EXPECT_EQ(FileBaseName(u"c:\\x.y\\a"), back_slash ? u"a" : u"c:\\x.y\\a");
}

}  // namespace
}  // namespace zm
