#include "engine/platform/win32/drawing_fonts_p.h"

#include <algorithm>

namespace zm::platform {
namespace {

/// Larger glyphs than this cannot be drawn: the system renders each glyph whole, which takes
/// memory by the square of its height.
constexpr std::int32_t kMaxFontHeight = 8192;

/// The system knows families by at most 31 characters. A longer name is that of no font, and
/// without a name the system chooses by the other traits, as for any font that is missing.
void SetFamily(LOGFONTW& traits, const std::u16string& family) {
    const std::size_t length = std::min(family.find(u'\0'), family.size());
    if (length < LF_FACESIZE) {
        std::copy_n(family.begin(), length, reinterpret_cast<char16_t*>(traits.lfFaceName));
    }
}

}  // namespace

HFONT MakeSystemFont(const TDrawFont& font, TFontUse use) {
    LOGFONTW traits{};
    traits.lfHeight = std::clamp(font.height, -kMaxFontHeight, kMaxFontHeight);
    traits.lfWeight = font.bold ? FW_BOLD : FW_NORMAL;
    traits.lfItalic = font.italic ? TRUE : FALSE;
    traits.lfUnderline = font.underline ? TRUE : FALSE;
    traits.lfStrikeOut = font.strike_out ? TRUE : FALSE;
    traits.lfCharSet = DEFAULT_CHARSET;
    // The library draws outline fonts only.
    traits.lfOutPrecision = use == TFontUse::kVector ? OUT_TT_ONLY_PRECIS : OUT_DEFAULT_PRECIS;
    traits.lfQuality = use == TFontUse::kVector ? DEFAULT_QUALITY : NONANTIALIASED_QUALITY;
    traits.lfPitchAndFamily = VARIABLE_PITCH | FF_SWISS;
    SetFamily(traits, font.family);
    return ::CreateFontIndirectW(&traits);
}

}  // namespace zm::platform
