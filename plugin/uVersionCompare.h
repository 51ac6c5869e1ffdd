#pragma once

#include <array>
#include <cstdint>
#include <string>
#include <string_view>

/// Dotted version texts.
namespace zm {

/// Major, minor, release, build.
using TVersionFields = std::array<std::int32_t, 4>;

/// Takes the next field off `text`: its leading run of the digits 0 to 9 as a number, 0 when the
/// run is empty or exceeds 32 bits. The character that ended the run is dropped whatever it is,
/// and at most 100 characters of the rest are kept.
std::int32_t NextVersionField(std::u16string_view& text);

TVersionFields SplitVersion(std::u16string_view text);

/// -1, 0 or 1; the first field that differs decides.
std::int32_t CompareVersions(std::u16string_view a, std::u16string_view b);

}  // namespace zm
