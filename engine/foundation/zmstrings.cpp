#include "engine/foundation/zmstrings.h"

#include <algorithm>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/files.h"

namespace zm {
namespace {

constexpr char32_t kEscapeBase = 0xDC00;  // byte b of malformed UTF-8 stands as U+DC00 + b

bool IsHighSurrogate(char16_t unit) {
    return unit >= 0xD800 && unit <= 0xDBFF;
}

bool IsLowSurrogate(char16_t unit) {
    return unit >= 0xDC00 && unit <= 0xDFFF;
}

bool IsEscapedByte(char16_t unit) {
    return unit >= kEscapeBase + 0x80 && unit <= kEscapeBase + 0xFF;
}

void AppendByte(std::string& text, char32_t value) {
    text += static_cast<char>(static_cast<std::uint8_t>(value));
}

void AppendUtf8(std::string& text, char32_t code) {
    if (code < 0x80) {
        AppendByte(text, code);
    } else if (code < 0x800) {
        AppendByte(text, 0xC0 | (code >> 6));
        AppendByte(text, 0x80 | (code & 0x3F));
    } else if (code < 0x10000) {
        AppendByte(text, 0xE0 | (code >> 12));
        AppendByte(text, 0x80 | ((code >> 6) & 0x3F));
        AppendByte(text, 0x80 | (code & 0x3F));
    } else {
        AppendByte(text, 0xF0 | (code >> 18));
        AppendByte(text, 0x80 | ((code >> 12) & 0x3F));
        AppendByte(text, 0x80 | ((code >> 6) & 0x3F));
        AppendByte(text, 0x80 | (code & 0x3F));
    }
}

void AppendUtf16(std::u16string& text, char32_t code) {
    if (code < 0x10000) {
        text += static_cast<char16_t>(code);
        return;
    }
    code -= 0x10000;
    text += static_cast<char16_t>(0xD800 + (code >> 10));
    text += static_cast<char16_t>(0xDC00 + (code & 0x3FF));
}

/// Length of the sequence that a lead byte announces and its payload bits; 0 for no lead byte.
std::size_t SequenceLength(std::uint8_t lead, char32_t& payload) {
    if (lead < 0x80) {
        payload = lead;
        return 1;
    }
    if (lead >= 0xC2 && lead <= 0xDF) {
        payload = lead & 0x1F;
        return 2;
    }
    if ((lead & 0xF0) == 0xE0) {
        payload = lead & 0x0F;
        return 3;
    }
    if (lead >= 0xF0 && lead <= 0xF4) {
        payload = lead & 0x07;
        return 4;
    }
    return 0;
}

/// Length of the well-formed sequence at the start of `text`, or 0 (RFC 3629 section 4).
std::size_t DecodeSequence(std::string_view text, char32_t& code) {
    static constexpr char32_t kSmallest[] = {0, 0, 0x80, 0x800, 0x10000};
    const std::size_t length = SequenceLength(static_cast<std::uint8_t>(text.front()), code);
    if (length == 0 || length > text.size()) {
        return 0;
    }
    for (std::size_t i = 1; i < length; ++i) {
        const auto byte = static_cast<std::uint8_t>(text[i]);
        if ((byte & 0xC0) != 0x80) {
            return 0;
        }
        code = (code << 6) | (byte & 0x3Fu);
    }
    const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
    return code < kSmallest[length] || surrogate || code > 0x10FFFF ? 0 : length;
}

template <typename TChar>
bool IsBlank(TChar character) {
    return character == TChar{' '} || character == TChar{'\t'};
}

template <typename TChar>
std::optional<std::int32_t> ParseIntegerOf(std::basic_string_view<TChar> text) {
    while (!text.empty() && IsBlank(text.front())) {
        text.remove_prefix(1);
    }
    while (!text.empty() && IsBlank(text.back())) {
        text.remove_suffix(1);
    }
    const bool negative = !text.empty() && text.front() == TChar{'-'};
    if (negative || (!text.empty() && text.front() == TChar{'+'})) {
        text.remove_prefix(1);
    }
    if (text.empty()) {
        return std::nullopt;
    }
    std::int64_t value = 0;
    for (const TChar character : text) {
        if (character < TChar{'0'} || character > TChar{'9'}) {
            return std::nullopt;
        }
        value = value * 10 + (character - TChar{'0'});
        if (value > std::int64_t{kMaxInt32} + 1) {
            return std::nullopt;
        }
    }
    value = negative ? -value : value;
    return value > kMaxInt32 ? std::nullopt
                             : std::optional<std::int32_t>(static_cast<std::int32_t>(value));
}

template <typename TChar>
TChar LowerOf(TChar character) {
    const bool upper = character >= TChar{'A'} && character <= TChar{'Z'};
    return upper ? static_cast<TChar>(character + 32) : character;
}

template <typename TChar>
TChar UpperOf(TChar character) {
    const bool lower = character >= TChar{'a'} && character <= TChar{'z'};
    return lower ? static_cast<TChar>(character - 32) : character;
}

template <typename TText, typename TMap>
TText Mapped(const TText& text, TMap map) {
    TText result = text;
    std::transform(result.begin(), result.end(), result.begin(), map);
    return result;
}

/// A run of capital letters and what turns them into small ones. With step 2 only every second
/// character, from the first, is a capital.
struct TFoldRange {
    char16_t first;
    char16_t last;
    std::int16_t offset;
    std::uint8_t step;
};

/// Simple case folding of the Unicode character database, for the scripts that key names use.
constexpr TFoldRange kFoldRanges[] = {
    {0x0041, 0x005A, 32, 1},   // ASCII
    {0x00B5, 0x00B5, 775, 1},  // micro sign to mu
    {0x00C0, 0x00D6, 32, 1},   // Latin-1
    {0x00D8, 0x00DE, 32, 1},
    {0x0178, 0x0178, -121, 1},  // y with diaeresis, whose small letter is
                                // in Latin-1
    {0x0386, 0x0386, 38, 1},    // Greek
    {0x0388, 0x038A, 37, 1},
    {0x038C, 0x038C, 64, 1},
    {0x038E, 0x038F, 63, 1},
    {0x0391, 0x03A1, 32, 1},
    {0x03A3, 0x03AB, 32, 1},
    {0x03C2, 0x03C2, 1, 1},   // final sigma
    {0x0400, 0x040F, 80, 1},  // Cyrillic
    {0x0410, 0x042F, 32, 1},
    {0x0460, 0x0480, 1, 2},
    {0x048A, 0x04BE, 1, 2},
    {0x04C0, 0x04C0, 15, 1},
    {0x04C1, 0x04CD, 1, 2},
    {0x04D0, 0x052E, 1, 2},
};

char16_t FoldCase(char16_t character) {
    for (const TFoldRange& range : kFoldRanges) {
        if (character >= range.first && character <= range.last) {
            const bool capital = (character - range.first) % range.step == 0;
            return static_cast<char16_t>(character + (capital ? range.offset : 0));
        }
    }
    return character;
}

std::size_t BaseNameStart(std::u16string_view file_name) {
    std::size_t start = file_name.size();
    while (start > 0 && !platform::IsPathSeparator(file_name[start - 1])) {
        --start;
    }
    return start;
}

}  // namespace

std::string Utf8FromUtf16(std::u16string_view text) {
    std::string result;
    result.reserve(text.size());
    for (std::size_t i = 0; i < text.size(); ++i) {
        const char16_t unit = text[i];
        if (IsHighSurrogate(unit) && i + 1 < text.size() && IsLowSurrogate(text[i + 1])) {
            ++i;
            const char32_t high = unit - 0xD800u;
            AppendUtf8(result, 0x10000 + (high << 10) + (text[i] - 0xDC00u));
        } else if (IsEscapedByte(unit)) {
            AppendByte(result, unit - kEscapeBase);
        } else {
            AppendUtf8(result, unit);
        }
    }
    return result;
}

std::u16string Utf16FromUtf8(std::string_view text) {
    std::u16string result;
    result.reserve(text.size());
    while (!text.empty()) {
        char32_t code = 0;
        std::size_t length = DecodeSequence(text, code);
        if (length == 0) {
            length = 1;
            code = kEscapeBase + static_cast<std::uint8_t>(text.front());
        }
        AppendUtf16(result, code);
        text.remove_prefix(length);
    }
    return result;
}

std::optional<std::int32_t> ParseInteger(std::u16string_view text) {
    return ParseIntegerOf(text);
}

std::optional<std::int32_t> ParseInteger(std::string_view text) {
    return ParseIntegerOf(text);
}

std::u16string IntegerToText(std::int64_t value) {
    const std::string text = std::to_string(value);
    return {text.begin(), text.end()};
}

std::string AsciiLower(std::string_view text) {
    return Mapped(std::string(text), LowerOf<char>);
}

std::string AsciiUpper(std::string_view text) {
    return Mapped(std::string(text), UpperOf<char>);
}

std::u16string AsciiLower(std::u16string_view text) {
    return Mapped(std::u16string(text), LowerOf<char16_t>);
}

std::u16string AsciiUpper(std::u16string_view text) {
    return Mapped(std::u16string(text), UpperOf<char16_t>);
}

bool AsciiEqualNoCase(std::u16string_view a, std::u16string_view b) {
    return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                      [](char16_t x, char16_t y) { return LowerOf(x) == LowerOf(y); });
}

bool KeysEqualNoCase(std::u16string_view a, std::u16string_view b) {
    return std::equal(a.begin(), a.end(), b.begin(), b.end(),
                      [](char16_t x, char16_t y) { return FoldCase(x) == FoldCase(y); });
}

std::u16string FoldKeyCase(std::u16string_view text) {
    return Mapped(std::u16string(text), FoldCase);
}

std::vector<std::u16string> SplitLines(std::u16string_view text) {
    std::vector<std::u16string> lines;
    while (!text.empty()) {
        const std::size_t end = std::min(text.find_first_of(u"\r\n"), text.size());
        lines.emplace_back(text.substr(0, end));
        const bool pair = text.substr(end, 2) == u"\r\n";
        text.remove_prefix(std::min(text.size(), end + (pair ? 2 : 1)));
    }
    return lines;
}

std::vector<std::string> SplitText(std::string_view text, char separator) {
    std::vector<std::string> parts;
    while (true) {
        const std::size_t end = text.find(separator);
        parts.emplace_back(text.substr(0, end));
        if (end == std::string_view::npos) {
            return parts;
        }
        text.remove_prefix(end + 1);
    }
}

std::u16string FileExtension(std::u16string_view file_name) {
    const std::u16string_view base = file_name.substr(BaseNameStart(file_name));
    const std::size_t dot = base.rfind(u'.');
    return dot == std::u16string_view::npos ? std::u16string() : std::u16string(base.substr(dot));
}

std::u16string FileFolder(std::u16string_view file_name) {
    return std::u16string(file_name.substr(0, BaseNameStart(file_name)));
}

std::u16string FileBaseName(std::u16string_view file_name) {
    return std::u16string(file_name.substr(BaseNameStart(file_name)));
}

}  // namespace zm
