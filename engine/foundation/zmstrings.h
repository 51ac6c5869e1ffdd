#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

/// Text forms. Wide text is UTF-16 in `std::u16string`, as the host's records and the system's
/// file names are. UTF-8 is used toward Linux, terminals and exception texts.
namespace zm {

/// UTF-16 to UTF-8, without loss: a lone low surrogate U+DC80 to U+DCFF becomes the single byte
/// 80 to FF (so that any byte string survives Utf16FromUtf8 and back); any other unpaired
/// surrogate becomes its three-byte form.
std::string Utf8FromUtf16(std::u16string_view text);

/// UTF-8 to UTF-16; a byte that is no part of well-formed UTF-8 becomes U+DC00 + the byte.
std::u16string Utf16FromUtf8(std::string_view text);

/// A decimal integer as users type it: blanks around it are ignored, an optional sign, decimal
/// digits, nothing else; nothing on any other text and on a value outside 32 bits.
std::optional<std::int32_t> ParseInteger(std::u16string_view text);
std::optional<std::int32_t> ParseInteger(std::string_view text);

/// Decimal text of an integer.
std::u16string IntegerToText(std::int64_t value);

/// ASCII case folding only; other characters stay.
std::string AsciiLower(std::string_view text);
std::string AsciiUpper(std::string_view text);
std::u16string AsciiLower(std::u16string_view text);
std::u16string AsciiUpper(std::u16string_view text);
bool AsciiEqualNoCase(std::u16string_view a, std::u16string_view b);

/// Case folding of key names: simple folding of ASCII, Latin-1, Greek and Cyrillic letters,
/// independent of the locale. Used where the host compares keys without case.
bool KeysEqualNoCase(std::u16string_view a, std::u16string_view b);
/// The text with that folding done: two keys are equal without case when their foldings are.
std::u16string FoldKeyCase(std::u16string_view text);

/// Lines of a text, split at CR LF, CR or LF; a final line end adds no empty line.
std::vector<std::u16string> SplitLines(std::u16string_view text);

/// Parts between separators; an empty text gives one empty part.
std::vector<std::string> SplitText(std::string_view text, char separator);

/// Extension of a file name with its dot (".jpg"), or empty. The last path part only.
std::u16string FileExtension(std::u16string_view file_name);
/// Folder part with its trailing separator, or empty.
std::u16string FileFolder(std::u16string_view file_name);
/// Last path part.
std::u16string FileBaseName(std::u16string_view file_name);

}  // namespace zm
