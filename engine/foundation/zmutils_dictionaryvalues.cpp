#include "engine/foundation/zmutils_dictionaryvalues.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <system_error>

namespace zm {

std::unique_ptr<TObject> TObjectList::Clone() const {
    auto copy = std::make_unique<TObjectList>();
    copy->items_.reserve(items_.size());
    for (const auto& item : items_) {
        copy->Add(item->Clone());
    }
    return copy;
}

TObject* TObjectList::GetItem(std::int32_t index) const {
    return index >= 0 && index < GetCount() ? items_[static_cast<std::size_t>(index)].get()
                                            : nullptr;
}

std::optional<double> NeutralTextToDouble(std::u16string_view text) {
    static constexpr std::u16string_view kNumberCharacters = u"+-.0123456789Ee";
    if (!text.empty() && text.front() == u'+') {
        text.remove_prefix(1);
        if (!text.empty() && text.front() == u'-') {
            return std::nullopt;
        }
    }
    // This also keeps out the library's words for infinity and not-a-number.
    if (text.find_first_not_of(kNumberCharacters) != std::u16string_view::npos) {
        return std::nullopt;
    }
    std::string plain(text.size(), '\0');
    std::transform(text.begin(), text.end(), plain.begin(),
                   [](char16_t character) { return static_cast<char>(character); });
    double value = 0;
    const auto [end, error] = std::from_chars(plain.data(), plain.data() + plain.size(), value);
    const bool whole = error == std::errc() && end == plain.data() + plain.size();
    return whole ? std::optional<double>(value) : std::nullopt;
}

std::u16string DoubleToNeutralText(double value) {
    if (!std::isfinite(value)) {
        return u"0.0";
    }
    std::array<char, 32> buffer{};
    const char* const end = std::to_chars(buffer.data(), buffer.data() + buffer.size(), value).ptr;
    std::string text(static_cast<const char*>(buffer.data()), end);
    if (text.find('.') == std::string::npos) {
        text.insert(std::min(text.find('e'), text.size()), ".0");
    }
    return {text.begin(), text.end()};
}

}  // namespace zm
