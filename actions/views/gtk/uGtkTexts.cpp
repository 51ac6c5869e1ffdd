#include "actions/views/gtk/uGtkTexts.h"

#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

// U+10F800 is this pair's first unit and a second one from DC00; the thousand characters for
// high surrogates come first, those for low ones follow under the next first unit.
constexpr char16_t kHighStandInLead = 0xDBFE;
constexpr char16_t kLowStandInLead = 0xDBFF;
constexpr char16_t kSurrogateMask = 0xFC00;
constexpr char16_t kSurrogateBits = 0x03FF;
constexpr char16_t kHighSurrogates = 0xD800;
constexpr char16_t kLowSurrogates = 0xDC00;

bool IsHigh(char16_t unit) {
    return (unit & kSurrogateMask) == kHighSurrogates;
}

bool IsLow(char16_t unit) {
    return (unit & kSurrogateMask) == kLowSurrogates;
}

bool PairAt(std::u16string_view text, std::size_t index) {
    return index + 1 < text.size() && IsHigh(text[index]) && IsLow(text[index + 1]);
}

char16_t Surrogate(char16_t kind, char16_t bits_of) {
    return static_cast<char16_t>(kind | (bits_of & kSurrogateBits));
}

}  // namespace

std::string ViewText(std::u16string_view text) {
    std::u16string shown;
    shown.reserve(text.size());
    for (std::size_t index = 0; index < text.size(); ++index) {
        const char16_t unit = text[index];
        if (PairAt(text, index)) {
            shown.append({unit, text[++index]});
        } else if (IsHigh(unit) || IsLow(unit)) {
            shown.append({IsHigh(unit) ? kHighStandInLead : kLowStandInLead,
                          Surrogate(kLowSurrogates, unit)});
        } else {
            shown.push_back(unit);
        }
    }
    return Utf8FromUtf16(shown);
}

std::u16string ModelText(const char* view_text) {
    const std::u16string shown = Utf16FromUtf8(view_text);
    std::u16string text;
    text.reserve(shown.size());
    for (std::size_t index = 0; index < shown.size(); ++index) {
        const bool stands_in = PairAt(shown, index) && shown[index] >= kHighStandInLead;
        if (stands_in) {
            const bool high = shown[index] == kHighStandInLead;
            ++index;
            text.push_back(Surrogate(high ? kHighSurrogates : kLowSurrogates, shown[index]));
        } else {
            text.push_back(shown[index]);
        }
    }
    return text;
}

std::string MnemonicText(std::u16string_view caption) {
    std::u16string marked;
    for (std::size_t index = 0; index < caption.size(); ++index) {
        char16_t unit = caption[index];
        const bool marks = unit == u'&' && index + 1 < caption.size();
        if (marks) {
            unit = caption[++index];
            marked += unit == u'&' ? u"" : u"_";
        }
        marked += unit == u'_' ? std::u16string(u"__") : std::u16string(1, unit);
    }
    return ViewText(marked);
}

std::int32_t CharactersBefore(std::u16string_view text, std::int32_t units) {
    std::int32_t characters = 0;
    for (std::size_t index = 0; index < text.size() && static_cast<std::int64_t>(index) < units;
         ++index) {
        index += PairAt(text, index) ? 1 : 0;
        ++characters;
    }
    return characters;
}

std::int32_t UnitsBefore(std::u16string_view text, std::int32_t characters) {
    std::size_t index = 0;
    for (; characters > 0 && index < text.size(); --characters) {
        index += PairAt(text, index) ? 2 : 1;
    }
    return static_cast<std::int32_t>(index);
}

}  // namespace zm
