#pragma once

#include <cstdint>
#include <string>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// Set of font styles: bit 0 bold, bit 1 italic, bit 2 underline, bit 3 strike-out.
enum TFontStyle : std::uint8_t { fsBold = 1, fsItalic = 2, fsUnderline = 4, fsStrikeOut = 8 };
using TFontStyles = std::uint8_t;
inline constexpr TFontStyles kAllFontStyles = 15;

/// What a platform canvas writes with: a description by name and size. Whether the machine has
/// such a font shows when text is drawn; the font layer then takes the nearest that it has.
class TFont {
public:
    std::u16string Name = u"Tahoma";
    TColor Color = 0;
    TFontStyles Style = 0;
    /// In pixels: negative the height of the em square, positive that of a line, 0 the platform's
    /// default size.
    std::int32_t Height = -11;

    /// In points at the screen's resolution; negative where Height is that of a line.
    std::int32_t GetSize() const;
    /// Height becomes -round(points x dots per inch / 72), ties to even, limited to 32 bits.
    void SetSize(std::int32_t points);
};

}  // namespace zm
