#include "plugin/uVersionCompare.h"

#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

constexpr std::size_t kMaxRestLength = 100;

}  // namespace

std::int32_t NextVersionField(std::u16string_view& text) {
    std::size_t digits = 0;
    while (digits < text.size() && text[digits] >= u'0' && text[digits] <= u'9') {
        ++digits;
    }
    const std::int32_t value = ParseInteger(text.substr(0, digits)).value_or(0);
    text = digits < text.size() ? text.substr(digits + 1, kMaxRestLength) : std::u16string_view();
    return value;
}

TVersionFields SplitVersion(std::u16string_view text) {
    TVersionFields fields{};
    for (std::int32_t& field : fields) {
        field = NextVersionField(text);
    }
    return fields;
}

std::int32_t CompareVersions(std::u16string_view a, std::u16string_view b) {
    const TVersionFields fields_a = SplitVersion(a);
    const TVersionFields fields_b = SplitVersion(b);
    if (fields_a == fields_b) {
        return 0;
    }
    return fields_a < fields_b ? -1 : 1;
}

}  // namespace zm
