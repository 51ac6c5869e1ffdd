#include "engine/foundation/zmutils_dictionaryparser.h"

#include <algorithm>

#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

constexpr std::u16string_view kJsonDelimiters = u"{}[]\":,";
constexpr std::u16string_view kXmlDelimiters = u"<>/'\"=?";

bool IsOneOf(char16_t character, std::u16string_view set) {
    return set.find(character) != std::u16string_view::npos;
}

std::u16string_view Trimmed(std::u16string_view text) {
    const auto is_blank = [](char16_t character) { return character <= u' '; };
    const auto first = std::find_if_not(text.begin(), text.end(), is_blank);
    const auto last = std::find_if_not(text.rbegin(), text.rend(), is_blank).base();
    return first < last ? std::u16string_view(first, last) : std::u16string_view();
}

/// The only escape of quoted texts.
std::u16string ResolveEscapes(std::u16string_view text) {
    std::u16string result;
    result.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] == u'\\' && i + 1 < text.size() && text[i + 1] == u'"') {
            ++i;
        }
        result += text[i];
    }
    return result;
}

/// A word without a point; what is no integer of 32 bits is 0.
std::int32_t IntegerOfWord(std::u16string_view word) {
    const bool has_tab = IsOneOf(u'\t', word);
    return has_tab ? 0 : ParseInteger(word).value_or(0);
}

}  // namespace

bool TZmDictionaryParser::Parse(TZmDictionary& target) {
    if (m_lang == zmplJSON) {
        ParseObject(target, 1);
    } else {
        ParseContent(target, 0);
        m_abort = m_abort || !AtEnd();  // an end tag that nothing opened
    }
    return !m_abort;
}

bool TZmDictionaryParser::Abort() {
    m_abort = true;
    return false;
}

void TZmDictionaryParser::SkipWhitespace() {
    m_textPos = std::min(m_text.find_first_not_of(kDictionaryWhitespace, m_textPos), m_text.size());
}

/// Whether a character comes next, whitespace skipped.
bool TZmDictionaryParser::NextIs(char16_t character) {
    SkipWhitespace();
    return !AtEnd() && m_text[m_textPos] == character;
}

bool TZmDictionaryParser::SkipIf(char16_t character) {
    const bool is_next = NextIs(character);
    m_textPos += is_next ? 1 : 0;
    return is_next;
}

bool TZmDictionaryParser::Expect(char16_t character) {
    return SkipIf(character) || Abort();
}

bool TZmDictionaryParser::Quoted(std::u16string& text) {
    if (!NextIs(u'"') && !NextIs(u'\'')) {
        return Abort();
    }
    const char16_t quote = m_text[m_textPos];
    const std::size_t start = m_textPos + 1;
    std::size_t end = m_text.find(quote, start);
    // Required: a backslash always keeps the quote inside, even one that follows a backslash.
    while (end != std::u16string::npos && m_text[end - 1] == u'\\') {
        end = m_text.find(quote, end + 1);
    }
    if (end == std::u16string::npos) {
        m_textPos = m_text.size();
        return Abort();
    }
    text = ResolveEscapes(std::u16string_view(m_text).substr(start, end - start));
    m_textPos = end + 1;
    return true;
}

/// Characters up to whitespace or a delimiter; may be empty.
std::u16string_view TZmDictionaryParser::Word() {
    const std::u16string_view delimiters = m_lang == zmplJSON ? kJsonDelimiters : kXmlDelimiters;
    SkipWhitespace();
    const std::size_t start = m_textPos;
    while (!AtEnd() && !IsOneOf(m_text[m_textPos], delimiters) &&
           !IsOneOf(m_text[m_textPos], kDictionaryWhitespace)) {
        ++m_textPos;
    }
    return std::u16string_view(m_text).substr(start, m_textPos - start);
}

void TZmDictionaryParser::ParseObject(TZmDictionary& target, int level) {
    if (level > kMaxJsonLevels || !Expect(u'{')) {
        Abort();
        return;
    }
    while (!SkipIf(u'}')) {
        std::u16string key;
        if (!Quoted(key) || !Expect(u':')) {
            return;
        }
        std::unique_ptr<TObject> value = ParseValue(level + 1);
        if (value != nullptr) {
            target.InsertOrGather(key, std::move(value));
        }
        if (m_abort || SkipIf(u'}')) {
            return;
        }
        if (!Expect(u',')) {
            return;
        }
    }
}

/// The value that comes next: as far as it was read when an error came inside it, nil when
/// nothing of it was read.
std::unique_ptr<TObject> TZmDictionaryParser::ParseValue(int level) {
    if (NextIs(u'{')) {
        auto dictionary = std::make_unique<TZmDictionary>();
        ParseObject(*dictionary, level);
        return dictionary;
    }
    if (NextIs(u'[')) {
        return ParseList(level);
    }
    if (NextIs(u'"')) {
        std::u16string text;
        if (!Quoted(text)) {
            return nullptr;
        }
        return std::make_unique<TZmDictionaryValueWideString>(std::move(text));
    }
    return ParseWord();
}

std::unique_ptr<TObject> TZmDictionaryParser::ParseList(int level) {
    auto list = std::make_unique<TObjectList>();
    if (level > kMaxJsonLevels || !Expect(u'[')) {
        Abort();
        return list;
    }
    if (SkipIf(u']')) {
        return list;
    }
    while (true) {
        std::unique_ptr<TObject> value = ParseValue(level + 1);
        if (m_abort) {
            return list;
        }
        list->Add(std::move(value));
        if (SkipIf(u']') || !Expect(u',')) {
            return list;
        }
    }
}

std::unique_ptr<TObject> TZmDictionaryParser::ParseWord() {
    const std::u16string_view word = Word();
    if (word.empty() || word.front() == u'\t') {
        Abort();
        return nullptr;
    }
    if (word == u"true" || word == u"false") {
        return std::make_unique<TZmDictionaryValueBoolean>(word == u"true");
    }
    if (IsOneOf(u'.', word)) {
        return std::make_unique<TZmDictionaryValueDouble>(NeutralTextToDouble(word).value_or(0));
    }
    return std::make_unique<TZmDictionaryValueInteger>(IntegerOfWord(word));
}

/// Text and elements up to "</", which stays, or the end of the text.
void TZmDictionaryParser::ParseContent(TZmDictionary& target, int level) {
    while (!m_abort && !AtEnd()) {
        const std::size_t tag = std::min(m_text.find(u'<', m_textPos), m_text.size());
        const auto text = Trimmed(std::u16string_view(m_text).substr(m_textPos, tag - m_textPos));
        m_textPos = tag;
        if (!text.empty()) {
            target.InsertOrGather(
                u"#text", std::make_unique<TZmDictionaryValueWideString>(std::u16string(text)));
        }
        if (AtEnd() || std::u16string_view(m_text).substr(tag, 2) == u"</") {
            return;
        }
        ParseElement(target, level + 1);
    }
}

void TZmDictionaryParser::ParseElement(TZmDictionary& parent, int level) {
    if (level > kMaxXmlElements || !Expect(u'<')) {
        Abort();
        return;
    }
    const bool is_instruction = !AtEnd() && m_text[m_textPos] == u'?';
    m_textPos += is_instruction ? 1 : 0;
    const std::u16string_view name = Word();
    if (name.empty()) {
        Abort();
        return;
    }
    auto owned = std::make_unique<TZmDictionary>();
    TZmDictionary& element = *owned;
    parent.InsertOrGather(name, std::move(owned));
    ParseAttributes(element);
    if (m_abort) {
        return;
    }
    if (is_instruction) {
        if (Expect(u'?')) {
            Expect(u'>');
        }
    } else {
        ParseElementEnd(element, level);
    }
}

/// Attributes up to the tag's ending, which stays.
void TZmDictionaryParser::ParseAttributes(TZmDictionary& element) {
    while (!NextIs(u'>') && !NextIs(u'?') && !NextIs(u'/')) {
        const std::u16string name(Word());
        std::u16string text;
        if (name.empty() || !Expect(u'=') || !Quoted(text)) {
            Abort();
            return;
        }
        element.InsertOrGather(name, std::make_unique<TZmDictionaryValueWideString>(text));
    }
}

/// "/>", or ">" with the content and the end tag.
void TZmDictionaryParser::ParseElementEnd(TZmDictionary& element, int level) {
    if (SkipIf(u'/')) {
        Expect(u'>');
        return;
    }
    if (!Expect(u'>')) {
        return;
    }
    auto owned = std::make_unique<TZmDictionary>();
    TZmDictionary& content = *owned;
    element.InsertOrGather(u"#content", std::move(owned));
    ParseContent(content, level);
    if (m_abort || !Expect(u'<') || !Expect(u'/')) {
        return;
    }
    Word();
    Expect(u'>');
}

}  // namespace zm
