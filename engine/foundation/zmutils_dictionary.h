#pragma once

#include <concepts>
#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <utility>

#include "engine/foundation/zmutils_dictionaryvalues.h"

namespace zm {

/// Bucket of a key, 0 to `buckets` - 1.
using TZmStrHashFunction = std::uint32_t (*)(std::u16string_view key, std::uint32_t buckets);

/// The ELF hash over 16-bit characters, modulo `buckets`; 0 for an empty key.
std::uint32_t ZmStrHash(std::u16string_view key, std::uint32_t buckets);

/// The two text forms of a dictionary.
enum TZmDictionaryParserLang : std::uint8_t { zmplJSON, zmplXML };

/// Buckets of the dictionaries that the parser makes.
inline constexpr std::uint32_t kDictionaryBuckets = 103;

struct TZmDictionaryBucket {
    std::u16string key;
    std::unique_ptr<TObject> value;
};

class TZmStrStrEnumerator;

/// A string-keyed tree. The dictionary owns its values; pointers that it hands out are valid until
/// their entry is replaced or erased. Keys keep the letters they were inserted with; without case
/// they are compared by the folding of KeysEqualNoCase.
///
/// The order of entries, which GetNext and Dump follow, is by bucket (the hash of the folded key),
/// and inside a bucket by the time of insertion. Looking up a key takes logarithmic time whatever
/// the hash function does, so that texts made to collide cost no more than others.
///
/// A missing key raises EZmException `Key "%s" not found` where a routine does not say otherwise.
/// `recursive` also searches the dictionaries that are values here or deeper, an entry of this
/// level first; dictionaries inside lists are not searched. Not thread-safe.
class TZmDictionary : public TObject {
public:
    explicit TZmDictionary(std::uint32_t buckets = kDictionaryBuckets, bool caseSensitive = false)
        : TZmDictionary(buckets, ZmStrHash, caseSensitive) {}
    /// 0 buckets count as 1; a result of `hashFunction` is taken modulo the buckets.
    TZmDictionary(std::uint32_t buckets, TZmStrHashFunction hashFunction, bool caseSensitive);
    std::string ClassName() const override { return "TZmDictionary"; }
    std::unique_ptr<TObject> Clone() const override;

    void Clear();
    bool IsEmpty() const { return m_buckets.empty(); }
    std::int32_t GetCount() const { return static_cast<std::int32_t>(m_buckets.size()); }
    bool HasKey(std::u16string_view key, bool recursive = false) const;
    /// The value, borrowed. Missing: nil when `silent`, else the exception.
    TObject* Get(std::u16string_view key, bool silent = false, bool recursive = false) const;

    /// A text; of a nested dictionary its text: the entry "#text", or the one of its "#content",
    /// so that an XML element with text reads as a string. Other values raise EZmException "Not
    /// string value".
    std::u16string GetString(std::u16string_view key, bool recursive = false) const;
    /// An integer, or a nested dictionary's text that is one; else EZmException "Not integer
    /// value".
    std::int32_t GetInteger(std::u16string_view key, bool recursive = false) const;
    /// A double or an integer, or a nested dictionary's text that is a number; else EZmException
    /// "Not double value".
    double GetDouble(std::u16string_view key, bool recursive = false) const;
    /// A boolean; else whether the text, direct or a nested dictionary's, equals "true".
    bool GetBoolean(std::u16string_view key, bool recursive = false) const;
    /// A nested dictionary or list, borrowed; else EZmException "Not dictionary value", "Not list
    /// value".
    TZmDictionary* GetDictionary(std::u16string_view key, bool recursive = false) const;
    TObjectList* GetList(std::u16string_view key, bool recursive = false) const;

    /// Puts a value under a key. A value that was there is freed, its entry keeps its place.
    void Insert(std::u16string_view key, std::unique_ptr<TObject> value);
    void Insert(std::u16string_view key, std::u16string_view value);
    void Insert(std::u16string_view key, std::int32_t value);
    void Insert(std::u16string_view key, double value);
    /// A template, so that no pointer turns into a boolean.
    void Insert(std::u16string_view key, std::same_as<bool> auto value) {
        Insert(key, std::make_unique<TZmDictionaryValueBoolean>(value));
    }
    /// Puts a value under a key; when there is one already, gathers both in a list under that
    /// key, or appends the new one when the old one is a list. Both text forms read repeated
    /// names this way.
    void InsertOrGather(std::u16string_view key, std::unique_ptr<TObject> value);

    /// Removes an entry, if there is one. The value is freed, or with `freeValue` false handed to
    /// the caller.
    std::unique_ptr<TObject> Erase(std::u16string_view key, bool freeValue = true);

    /// Moves a cursor to the next entry, to the first from a fresh one; false past the last.
    bool GetNext(TZmStrStrEnumerator& current) const;

    /// The text form, without blanks or line breaks. JSON: only double quotes are escaped, as \",
    /// so that a text that ends in a backslash does not read back. XML: texts stand as they are
    /// and lists as their values one after the other, which is a form for people and no inverse of
    /// the XML reader.
    std::u16string Dump(TZmDictionaryParserLang dumpType = zmplJSON) const;

    /// Replaces the contents by what a text holds: XML when its first character other than
    /// whitespace is "<", else JSON. False on any syntax error; what came before it is then in the
    /// dictionary.
    bool Parse(std::u16string_view text);

    /// Replaces the contents by a deep copy of another dictionary's, its kind of keys included.
    void Assign(const TZmDictionary& Source);

private:
    /// Bucket and number of the insertion: the order of entries.
    using TPlace = std::pair<std::uint32_t, std::uint64_t>;
    using TBuckets = std::map<TPlace, TZmDictionaryBucket>;
    friend class TZmStrStrEnumerator;

    std::u16string LookupForm(std::u16string_view key) const;
    TZmDictionaryBucket* Find(std::u16string_view key, bool recursive) const;

    std::uint32_t m_bucketCount;
    TZmStrHashFunction m_hashFunction;
    bool m_caseSensitive;
    TBuckets m_buckets;
    std::map<std::u16string, TBuckets::iterator> m_index;  ///< by key, folded without case
    std::uint64_t m_insertions = 0;
};

/// Iteration cursor of a dictionary. It stays usable while entries come and go; Key and Value
/// belong to the last successful GetNext and end with their entry.
class TZmStrStrEnumerator {
public:
    const std::u16string& Key() const { return m_bucket->key; }
    TObject* Value() const { return m_bucket->value.get(); }

private:
    friend class TZmDictionary;
    bool m_started = false;
    TZmDictionary::TPlace m_place;
    const TZmDictionaryBucket* m_bucket = nullptr;
};

}  // namespace zm
