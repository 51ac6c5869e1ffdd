#pragma once

#include <cstdint>

namespace zm {

class TZmBitmap;

/// Turns a picture that lies in the file as `orientation` tells (1 to 8, EXIF tag 0x0112) upright;
/// other numbers leave it alone. Pixels have 1, 3 or 4 whole bytes; an alpha plane is not turned.
/// False without room; the bitmap is then as it was, or empty.
[[nodiscard]] bool TurnUpright(TZmBitmap& bitmap, std::int32_t orientation);

}  // namespace zm
