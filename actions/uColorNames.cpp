#include "actions/uColorNames.h"

#include <cstdint>

#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

struct TColorName {
    std::uint32_t value;
    const char16_t* name;
};

/// Identifiers of the platform: the sixteen standard colours, the four extended ones, the colours
/// that the system's settings name, and the two special values.
constexpr TColorName kColorNames[] = {
    {0x000000, u"clBlack"},
    {0x000080, u"clMaroon"},
    {0x008000, u"clGreen"},
    {0x008080, u"clOlive"},
    {0x800000, u"clNavy"},
    {0x800080, u"clPurple"},
    {0x808000, u"clTeal"},
    {0x808080, u"clGray"},
    {0xC0C0C0, u"clSilver"},
    {0x0000FF, u"clRed"},
    {0x00FF00, u"clLime"},
    {0x00FFFF, u"clYellow"},
    {0xFF0000, u"clBlue"},
    {0xFF00FF, u"clFuchsia"},
    {0xFFFF00, u"clAqua"},
    {0xFFFFFF, u"clWhite"},
    {0xC0DCC0, u"clMoneyGreen"},
    {0xF0CAA6, u"clSkyBlue"},
    {0xF0FBFF, u"clCream"},
    {0xA4A0A0, u"clMedGray"},
    {0xFF000000, u"clScrollBar"},
    {0xFF000001, u"clBackground"},
    {0xFF000002, u"clActiveCaption"},
    {0xFF000003, u"clInactiveCaption"},
    {0xFF000004, u"clMenu"},
    {0xFF000005, u"clWindow"},
    {0xFF000006, u"clWindowFrame"},
    {0xFF000007, u"clMenuText"},
    {0xFF000008, u"clWindowText"},
    {0xFF000009, u"clCaptionText"},
    {0xFF00000A, u"clActiveBorder"},
    {0xFF00000B, u"clInactiveBorder"},
    {0xFF00000C, u"clAppWorkSpace"},
    {0xFF00000D, u"clHighlight"},
    {0xFF00000E, u"clHighlightText"},
    {0xFF00000F, u"clBtnFace"},
    {0xFF000010, u"clBtnShadow"},
    {0xFF000011, u"clGrayText"},
    {0xFF000012, u"clBtnText"},
    {0xFF000013, u"clInactiveCaptionText"},
    {0xFF000014, u"clBtnHighlight"},
    {0xFF000015, u"cl3DDkShadow"},
    {0xFF000016, u"cl3DLight"},
    {0xFF000017, u"clInfoText"},
    {0xFF000018, u"clInfoBk"},
    {0xFF00001A, u"clHotLight"},
    {0xFF00001B, u"clGradientActiveCaption"},
    {0xFF00001C, u"clGradientInactiveCaption"},
    {0xFF00001D, u"clMenuHighlight"},
    {0xFF00001E, u"clMenuBar"},
    {0x1FFFFFFF, u"clNone"},
    {0x20000000, u"clDefault"},
};

/// Rows of the table that a colour box offers, after its entry for custom colours.
constexpr std::int32_t kColorBoxRows = 20;

/// An identifier as people write it: without "cl", words apart, nothing abbreviated.
std::u16string PrettyName(std::u16string_view identifier) {
    if (identifier == u"clMedGray") {
        return u"Medium Gray";
    }
    std::u16string name;
    for (const char16_t character : identifier.substr(2)) {
        if (!name.empty() && character >= u'A' && character <= u'Z') {
            name += u' ';
        }
        name += character;
    }
    return name;
}

std::u16string HexadecimalText(std::uint32_t value) {
    constexpr char16_t kDigits[] = u"0123456789ABCDEF";
    std::u16string text = u"$";
    for (int shift = 28; shift >= 0; shift -= 4) {
        text += kDigits[value >> shift & 15];
    }
    return text;
}

}  // namespace

std::u16string ColorToText(TColor color) {
    const auto value = static_cast<std::uint32_t>(color);
    for (const TColorName& row : kColorNames) {
        if (row.value == value) {
            return row.name;
        }
    }
    return HexadecimalText(value);
}

std::u16string ColorDescription(TColor color) {
    std::u16string name = ColorToText(color);
    if (name.starts_with(u"cl")) {
        return AsciiLower(std::u16string_view(name).substr(2));
    }
    if (name.starts_with(u"$00")) {
        return u"#" + name.substr(3);
    }
    return name;
}

std::vector<std::u16string> ColorBoxItems() {
    std::vector<std::u16string> items{u"Custom..."};
    for (std::int32_t row = 0; row < kColorBoxRows; ++row) {
        items.push_back(PrettyName(kColorNames[row].name));
    }
    return items;
}

std::int32_t ColorBoxIndex(TColor color) {
    for (std::int32_t index = 1; index <= kColorBoxRows; ++index) {
        if (ColorBoxColor(index) == color) {
            return index;
        }
    }
    return 0;
}

TColor ColorBoxColor(std::int32_t index) {
    return index < 1 || index > kColorBoxRows ? 0
                                              : static_cast<TColor>(kColorNames[index - 1].value);
}

}  // namespace zm
