#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "engine/foundation/zmutils_dictionary.h"

namespace zm {

/// Whitespace of both text forms: space, backspace, carriage return, line feed.
// Required: the tab is none. Stored texts depend on it; a word keeps its tabs.
inline constexpr std::u16string_view kDictionaryWhitespace = u" \b\r\n";

/// Reads the JSON-like and the XML-like text of a dictionary. The first syntax error ends the
/// reading; what has been read stays in the result. There is no other report of an error.
///
/// Common: a word ends at whitespace or at a delimiter of its form. A quoted text opens with a
/// single or a double quote and closes at the same one unless a backslash stands before that; then
/// \" becomes ", all else stays as it is.
///
/// JSON: an object of quoted keys and values. A word is true, false, a double when it holds a
/// point, else an integer; a word that is no such number is 0. A missing value and a tab before
/// a value are errors. Text after the object is not looked at.
///
/// XML: an element becomes a dictionary of its attributes, with its content, a dictionary too,
/// under "#content"; text goes trimmed under "#text". Names of end tags may differ from their
/// start tags. Comments, declarations in "<!" and entities are not known.
///
/// Repeated keys are gathered in a list (TZmDictionary::InsertOrGather).
class TZmDictionaryParser {
public:
    /// Objects and lists inside one another; deeper texts are errors. Twice the next limit and
    /// some, because an XML element makes two levels: what either form could hold reads back
    /// from its JSON text.
    static constexpr int kMaxJsonLevels = 512;
    /// Elements inside one another.
    static constexpr int kMaxXmlElements = 250;

    TZmDictionaryParser(std::u16string_view text, TZmDictionaryParserLang lang)
        : m_text(text), m_lang(lang) {}

    /// Reads the whole text into `target`, beside what is there. True without a syntax error. To
    /// be called once.
    bool Parse(TZmDictionary& target);

private:
    bool AtEnd() const { return m_textPos >= m_text.size(); }
    bool Abort();
    void SkipWhitespace();
    bool NextIs(char16_t character);
    bool SkipIf(char16_t character);
    bool Expect(char16_t character);
    bool Quoted(std::u16string& text);
    std::u16string_view Word();

    void ParseObject(TZmDictionary& target, int level);
    std::unique_ptr<TObject> ParseValue(int level);
    std::unique_ptr<TObject> ParseList(int level);
    std::unique_ptr<TObject> ParseWord();

    void ParseContent(TZmDictionary& target, int level);
    void ParseElement(TZmDictionary& parent, int level);
    void ParseAttributes(TZmDictionary& element);
    void ParseElementEnd(TZmDictionary& element, int level);

    std::u16string m_text;
    std::size_t m_textPos = 0;
    bool m_abort = false;
    TZmDictionaryParserLang m_lang;
};

}  // namespace zm
