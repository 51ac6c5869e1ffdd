// Any bytes as the text of a dictionary, in both forms, each byte a character and each pair of
// bytes one. What was read is copied, looked through and written in both forms.

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <string>

#include "engine/foundation/zmutils_dictionary.h"
#include "engine/foundation/zmutils_dictionaryparser.h"

namespace {

constexpr std::size_t kMaxInputBytes = 1 << 16;

void Require(bool holds) {
    if (!holds) {
        std::abort();
    }
}

void Use(const std::u16string& text, zm::TZmDictionaryParserLang lang) {
    zm::TZmDictionary dictionary;
    zm::TZmDictionaryParser(text, lang).Parse(dictionary);
    const std::u16string dump = dictionary.Dump(zm::zmplJSON);
    zm::TZmDictionary copy(1, /*caseSensitive=*/true);
    copy.Assign(dictionary);
    Require(copy.Dump(zm::zmplJSON) == dump);
    dictionary.HasKey(u"no such key", /*recursive=*/true);
    // A text without a backslash reads back to the same tree.
    zm::TZmDictionary again;
    const bool read = again.Parse(dump);
    if (text.find(u'\\') == std::u16string::npos) {
        Require(read && again.Dump(zm::zmplJSON) == dump);
    }
    dictionary.Parse(dictionary.Dump(zm::zmplXML));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size > kMaxInputBytes) {
        return 0;
    }
    std::u16string narrow(data, data + size);
    std::u16string wide;
    for (std::size_t i = 0; i + 1 < size; i += 2) {
        wide += static_cast<char16_t>(data[i] | data[i + 1] << 8);
    }
    for (const auto lang : {zm::zmplJSON, zm::zmplXML}) {
        Use(narrow, lang);
        Use(wide, lang);
    }
    return 0;
}
