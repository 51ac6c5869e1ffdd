#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "engine/io/zmioparams.h"

/// The one list of the file parameters' fields: what the stream form holds, in its order and with
/// its versions, and what the text keys reach.
namespace zm {

class TZmFieldReader;
class TZmFieldWriter;

/// What can be done with the value of a type. A nil operation does not exist for the type.
struct TZmFieldType {
    const char* name;           ///< for the documentation
    std::int32_t last_ordinal;  ///< of an enumeration; -1 for other types
    void (*save)(void* value, TZmFieldWriter& writer);
    /// Leaves the value as it is when the reader fails or the bytes are no value of the type.
    void (*load)(void* value, TZmFieldReader& reader);
    void (*assign)(void* target, void* source);
    std::u16string (*text)(void* value);
    /// False, and the value left as it is, for a text that is no value of the type.
    bool (*parse)(void* value, std::u16string_view text);
};

/// Whether a field has a text key, and which way.
enum TZmKeyUse : std::uint8_t { kNoKey, kReadKey, kReadWriteKey };

/// `since` of a field that the stream form does not hold.
inline constexpr std::int32_t kNotStored = -1;

struct TZmIOField {
    const char* name;  ///< the field's name
    const char* key;   ///< the text key where it is not the field's name; else nil
    const TZmFieldType* type;
    void* (*address)(TIOParams& params);
    std::int32_t since;  ///< first version of the stream form that holds it
    TZmKeyUse use;
    /// Runs when a text has been set; nil when nothing depends on the field.
    void (*changed)(TIOParams& params);
};

/// The rows. Those that the stream form holds stand in its order.
struct TZmIOFieldTable {
    static std::span<const TZmIOField> Stored();
    static std::span<const TZmIOField> NotStored();

private:
    static const TZmIOField kStored[];
    static const TZmIOField kNotStoredRows[];
};

/// The key of a field in upper case; empty without one.
std::string KeyOfField(const TZmIOField& field);

}  // namespace zm
