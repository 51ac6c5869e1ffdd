#pragma once

#include <cstdint>
#include <string>
#include <string_view>

/// Texts on their way between forms and GTK, which takes well-formed UTF-8 only and counts
/// characters where forms count UTF-16 units.
namespace zm {

/// UTF-8 that GTK accepts. Unpaired surrogates, which stored texts may hold, become the last
/// private characters of Unicode (U+10F800 to U+10FFFF) and come back by ModelText, so that an
/// edit elsewhere in the text does not harm them.
std::string ViewText(std::u16string_view text);
/// The text that ViewText was made of, or what the user typed.
std::u16string ModelText(const char* view_text);

/// A caption with GTK's mnemonic marks: "_" before the letter, "__" for the character itself.
std::string MnemonicText(std::u16string_view caption);

/// Characters before a place in UTF-16 units, and the other way round. Places outside the text
/// count as its ends.
std::int32_t CharactersBefore(std::u16string_view text, std::int32_t units);
std::int32_t UnitsBefore(std::u16string_view text, std::int32_t characters);

}  // namespace zm
