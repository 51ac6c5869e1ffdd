#include "engine/foundation/zmutils_dictionary.h"

#include <algorithm>

#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmdefs.h"
#include "engine/foundation/zmstrings.h"
#include "engine/foundation/zmutils_dictionaryparser.h"

namespace zm {
namespace {

constexpr std::uint32_t kHashTopBits = 0xF0000000;
constexpr std::u16string_view kTextKey = u"#text";
constexpr std::u16string_view kContentKey = u"#content";

/// The text of a value that is a text; nil for others.
const std::u16string* DirectText(const TObject* value) {
    const auto* const text = dynamic_cast<const TZmDictionaryValueWideString*>(value);
    return text != nullptr ? &text->value : nullptr;
}

/// The text of a dictionary that the XML reader made of an element; nil when it has none.
const std::u16string* NestedText(const TObject* value) {
    const auto* dictionary = dynamic_cast<const TZmDictionary*>(value);
    if (dictionary == nullptr) {
        return nullptr;
    }
    if (!dictionary->HasKey(kTextKey)) {
        dictionary =
            dynamic_cast<const TZmDictionary*>(dictionary->Get(kContentKey, /*silent=*/true));
    }
    return dictionary != nullptr ? DirectText(dictionary->Get(kTextKey, /*silent=*/true)) : nullptr;
}

[[noreturn]] void RaiseMissing(std::u16string_view key) {
    throw EZmException("Key \"" + Utf8FromUtf16(key) + "\" not found");
}

/// The text forms; appends to one text, so that a deep tree copies nothing twice.
class TDumper {
public:
    explicit TDumper(TZmDictionaryParserLang lang) : lang_(lang) {}
    void AppendEntries(const TZmDictionary& dictionary);
    std::u16string Take() { return std::move(text_); }

private:
    void AppendValue(const TObject& value);
    void AppendList(const TObjectList& list);
    void AppendText(std::u16string_view text);
    bool AppendScalar(const TObject& value);

    TZmDictionaryParserLang lang_;
    std::u16string text_;
};

void TDumper::AppendText(std::u16string_view text) {
    if (lang_ == zmplXML) {
        text_ += text;
        return;
    }
    text_ += u'"';
    for (const char16_t character : text) {
        if (character == u'"') {
            text_ += u'\\';
        }
        text_ += character;
    }
    text_ += u'"';
}

void TDumper::AppendEntries(const TZmDictionary& dictionary) {
    const bool json = lang_ == zmplJSON;
    text_ += json ? u"{" : u"";
    TZmStrStrEnumerator entry;
    for (bool first = true; dictionary.GetNext(entry); first = false) {
        if (json) {
            text_ += first ? u"" : u",";
            AppendText(entry.Key());
            text_ += u':';
            AppendValue(*entry.Value());
        } else {
            text_ += u'<' + entry.Key() + u'>';
            AppendValue(*entry.Value());
            text_ += u"</" + entry.Key() + u'>';
        }
    }
    text_ += json ? u"}" : u"";
}

void TDumper::AppendList(const TObjectList& list) {
    const bool json = lang_ == zmplJSON;
    text_ += json ? u"[" : u"";
    for (std::int32_t i = 0; i < list.GetCount(); ++i) {
        text_ += json && i > 0 ? u"," : u"";
        AppendValue(*list.GetItem(i));
    }
    text_ += json ? u"]" : u"";
}

bool TDumper::AppendScalar(const TObject& value) {
    if (const auto* const text = DirectText(&value)) {
        AppendText(*text);
    } else if (const auto* const whole = dynamic_cast<const TZmDictionaryValueInteger*>(&value)) {
        text_ += IntegerToText(whole->value);
    } else if (const auto* const real = dynamic_cast<const TZmDictionaryValueDouble*>(&value)) {
        text_ += DoubleToNeutralText(real->value);
    } else if (const auto* const flag = dynamic_cast<const TZmDictionaryValueBoolean*>(&value)) {
        text_ += flag->value ? u"true" : u"false";
    } else {
        return false;
    }
    return true;
}

void TDumper::AppendValue(const TObject& value) {
    if (AppendScalar(value)) {
        return;
    }
    if (const auto* const dictionary = dynamic_cast<const TZmDictionary*>(&value)) {
        AppendEntries(*dictionary);
    } else if (const auto* const list = dynamic_cast<const TObjectList*>(&value)) {
        AppendList(*list);
    } else {
        text_ += Utf16FromUtf8(value.ClassName());
    }
}

}  // namespace

std::uint32_t ZmStrHash(std::u16string_view key, std::uint32_t buckets) {
    std::uint32_t hash = 0;
    for (const char16_t character : key) {
        hash = character + hash * 16;
        const std::uint32_t top = hash & kHashTopBits;
        hash = (hash ^ (top >> 24)) & ~top;
    }
    return hash % buckets;
}

TZmDictionary::TZmDictionary(std::uint32_t buckets, TZmStrHashFunction hashFunction,
                             bool caseSensitive)
    : m_bucketCount(std::max<std::uint32_t>(buckets, 1)),
      m_hashFunction(hashFunction),
      m_caseSensitive(caseSensitive) {}

std::unique_ptr<TObject> TZmDictionary::Clone() const {
    auto copy = std::make_unique<TZmDictionary>(m_bucketCount, m_hashFunction, m_caseSensitive);
    TZmStrStrEnumerator entry;
    while (GetNext(entry)) {
        copy->Insert(entry.Key(), entry.Value()->Clone());
    }
    return copy;
}

void TZmDictionary::Clear() {
    m_index.clear();
    m_buckets.clear();
}

std::u16string TZmDictionary::LookupForm(std::u16string_view key) const {
    return m_caseSensitive ? std::u16string(key) : FoldKeyCase(key);
}

TZmDictionaryBucket* TZmDictionary::Find(std::u16string_view key, bool recursive) const {
    const auto found = m_index.find(LookupForm(key));
    if (found != m_index.end()) {
        return &found->second->second;
    }
    if (!recursive) {
        return nullptr;
    }
    for (const auto& [place, bucket] : m_buckets) {
        const auto* const nested = dynamic_cast<const TZmDictionary*>(bucket.value.get());
        TZmDictionaryBucket* const deeper = nested != nullptr ? nested->Find(key, true) : nullptr;
        if (deeper != nullptr) {
            return deeper;
        }
    }
    return nullptr;
}

bool TZmDictionary::HasKey(std::u16string_view key, bool recursive) const {
    return Find(key, recursive) != nullptr;
}

TObject* TZmDictionary::Get(std::u16string_view key, bool silent, bool recursive) const {
    const TZmDictionaryBucket* const bucket = Find(key, recursive);
    if (bucket == nullptr && !silent) {
        RaiseMissing(key);
    }
    return bucket != nullptr ? bucket->value.get() : nullptr;
}

std::u16string TZmDictionary::GetString(std::u16string_view key, bool recursive) const {
    const TObject* const value = Get(key, /*silent=*/false, recursive);
    const std::u16string* text = DirectText(value);
    if (text == nullptr) {
        text = NestedText(value);
    }
    if (text == nullptr && dynamic_cast<const TZmDictionary*>(value) != nullptr) {
        RaiseMissing(kTextKey);
    }
    if (text == nullptr) {
        throw EZmException("Not string value");
    }
    return *text;
}

std::int32_t TZmDictionary::GetInteger(std::u16string_view key, bool recursive) const {
    const TObject* const value = Get(key, /*silent=*/false, recursive);
    if (const auto* const integer = dynamic_cast<const TZmDictionaryValueInteger*>(value)) {
        return integer->value;
    }
    const std::u16string* const text = NestedText(value);
    const auto number = text != nullptr ? ParseInteger(std::u16string_view(*text)) : std::nullopt;
    if (!number) {
        throw EZmException("Not integer value");
    }
    return *number;
}

double TZmDictionary::GetDouble(std::u16string_view key, bool recursive) const {
    const TObject* const value = Get(key, /*silent=*/false, recursive);
    if (const auto* const real = dynamic_cast<const TZmDictionaryValueDouble*>(value)) {
        return real->value;
    }
    if (const auto* const integer = dynamic_cast<const TZmDictionaryValueInteger*>(value)) {
        return integer->value;
    }
    const std::u16string* const text = NestedText(value);
    const auto number = text != nullptr ? NeutralTextToDouble(*text) : std::nullopt;
    if (!number) {
        throw EZmException("Not double value");
    }
    return *number;
}

bool TZmDictionary::GetBoolean(std::u16string_view key, bool recursive) const {
    const TObject* const value = Get(key, /*silent=*/false, recursive);
    if (const auto* const flag = dynamic_cast<const TZmDictionaryValueBoolean*>(value)) {
        return flag->value;
    }
    const std::u16string* const direct = DirectText(value);
    const std::u16string* const text = direct != nullptr ? direct : NestedText(value);
    return text != nullptr && *text == u"true";
}

TZmDictionary* TZmDictionary::GetDictionary(std::u16string_view key, bool recursive) const {
    auto* const nested = dynamic_cast<TZmDictionary*>(Get(key, /*silent=*/false, recursive));
    if (nested == nullptr) {
        throw EZmException("Not dictionary value");
    }
    return nested;
}

TObjectList* TZmDictionary::GetList(std::u16string_view key, bool recursive) const {
    auto* const list = dynamic_cast<TObjectList*>(Get(key, /*silent=*/false, recursive));
    if (list == nullptr) {
        throw EZmException("Not list value");
    }
    return list;
}

void TZmDictionary::Insert(std::u16string_view key, std::unique_ptr<TObject> value) {
    ZM_ASSERT(value != nullptr);
    std::u16string form = LookupForm(key);
    const auto found = m_index.find(form);
    if (found != m_index.end()) {
        found->second->second.value = std::move(value);
        return;
    }
    const TPlace place(m_hashFunction(form, m_bucketCount) % m_bucketCount, m_insertions++);
    TZmDictionaryBucket bucket{.key = std::u16string(key), .value = std::move(value)};
    const auto entry = m_buckets.emplace(place, std::move(bucket)).first;
    m_index.emplace(std::move(form), entry);
}

void TZmDictionary::Insert(std::u16string_view key, std::u16string_view value) {
    Insert(key, std::make_unique<TZmDictionaryValueWideString>(std::u16string(value)));
}

void TZmDictionary::Insert(std::u16string_view key, std::int32_t value) {
    Insert(key, std::make_unique<TZmDictionaryValueInteger>(value));
}

void TZmDictionary::Insert(std::u16string_view key, double value) {
    Insert(key, std::make_unique<TZmDictionaryValueDouble>(value));
}

void TZmDictionary::InsertOrGather(std::u16string_view key, std::unique_ptr<TObject> value) {
    TZmDictionaryBucket* const bucket = Find(key, /*recursive=*/false);
    if (bucket == nullptr) {
        Insert(key, std::move(value));
        return;
    }
    auto* list = dynamic_cast<TObjectList*>(bucket->value.get());
    if (list == nullptr) {
        auto gathered = std::make_unique<TObjectList>();
        list = gathered.get();
        // The entry always holds a value, also when memory runs out in Add.
        list->Add(std::exchange(bucket->value, std::move(gathered)));
    }
    list->Add(std::move(value));
}

std::unique_ptr<TObject> TZmDictionary::Erase(std::u16string_view key, bool freeValue) {
    const auto found = m_index.find(LookupForm(key));
    if (found == m_index.end()) {
        return nullptr;
    }
    std::unique_ptr<TObject> value = std::move(found->second->second.value);
    m_buckets.erase(found->second);
    m_index.erase(found);
    if (freeValue) {
        value.reset();
    }
    return value;
}

bool TZmDictionary::GetNext(TZmStrStrEnumerator& current) const {
    const auto next =
        current.m_started ? m_buckets.upper_bound(current.m_place) : m_buckets.begin();
    if (next == m_buckets.end()) {
        current.m_bucket = nullptr;
        return false;
    }
    current.m_started = true;
    current.m_place = next->first;
    current.m_bucket = &next->second;
    return true;
}

std::u16string TZmDictionary::Dump(TZmDictionaryParserLang dumpType) const {
    TDumper dumper(dumpType);
    dumper.AppendEntries(*this);
    return dumper.Take();
}

bool TZmDictionary::Parse(std::u16string_view text) {
    Clear();
    const std::size_t start = text.find_first_not_of(kDictionaryWhitespace);
    const bool is_xml = start != std::u16string_view::npos && text[start] == u'<';
    return TZmDictionaryParser(text, is_xml ? zmplXML : zmplJSON).Parse(*this);
}

void TZmDictionary::Assign(const TZmDictionary& Source) {
    if (&Source == this) {
        return;
    }
    const std::unique_ptr<TObject> copy = Source.Clone();
    auto& other = static_cast<TZmDictionary&>(*copy);
    m_bucketCount = other.m_bucketCount;
    m_hashFunction = other.m_hashFunction;
    m_caseSensitive = other.m_caseSensitive;
    m_buckets.swap(other.m_buckets);  // iterators in the index follow the entries
    m_index.swap(other.m_index);
    m_insertions = other.m_insertions;
}

}  // namespace zm
