#pragma once

namespace zm {

class TZmBitmap;

/// Makes `copy` a zm24RGB image of the colours of `source`, whose format and alpha stay as they
/// are. False without room.
[[nodiscard]] bool CopyColors(TZmBitmap& source, TZmBitmap& copy);

}  // namespace zm
