#include <map>

#include "engine/foundation/zmstrings.h"
#include "engine/io/zmioparams_fields_p.h"
#include "engine/io/zmioparams_types_p.h"

// Reaching the fields by text keys.
namespace zm {

namespace {

constexpr std::string_view kColorMapItemKey = "COLORMAPITEM";

using TKeys = std::map<std::string, const TZmIOField*, std::less<>>;

TKeys CollectKeys() {
    TKeys keys;
    for (const auto rows : {TZmIOFieldTable::Stored(), TZmIOFieldTable::NotStored()}) {
        for (const TZmIOField& field : rows) {
            if (field.use != kNoKey) {
                keys.emplace(KeyOfField(field), &field);
            }
        }
    }
    return keys;
}

const TZmIOField* FindField(const std::string& upper_key) {
    static const TKeys keys = CollectKeys();
    const auto found = keys.find(upper_key);
    return found == keys.end() ? nullptr : found->second;
}

/// "COLORMAPITEM" with the number of the entry behind it.
std::u16string TextOfColorMapItem(const TIOParams& params, std::string_view number) {
    const auto index = ParseInteger(number).value_or(-1);
    if (index < 0 || static_cast<std::size_t>(index) >= params.fColorMap.size()) {
        return {};
    }
    return TextOfValue(params.fColorMap[static_cast<std::size_t>(index)]);
}

}  // namespace

std::u16string TIOParams::GetProperty(std::u16string_view key) {
    const std::string upper_key = AsciiUpper(Utf8FromUtf16(key));
    if (const TZmIOField* field = FindField(upper_key); field != nullptr) {
        return field->type->text(field->address(*this));
    }
    if (upper_key.starts_with(kColorMapItemKey)) {
        return TextOfColorMapItem(*this, upper_key.substr(kColorMapItemKey.size()));
    }
    return {};
}

void TIOParams::SetProperty(std::u16string_view key, std::u16string_view value) {
    const TZmIOField* field = FindField(AsciiUpper(Utf8FromUtf16(key)));
    if (field == nullptr || field->use != kReadWriteKey) {
        return;
    }
    const bool is_set = field->type->parse(field->address(*this), value);
    if (is_set && field->changed != nullptr) {
        field->changed(*this);
    }
}

}  // namespace zm
