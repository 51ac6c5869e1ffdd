#pragma once

#include "engine/bitmap/zmxBitmaps.h"

namespace zm {

/// How the rows of a bitmap are mapped while this object lives; the former way comes back with
/// its end, however that comes.
class TAccessScope {
public:
    TAccessScope(TZmBitmap& bitmap, TZmDataAccess access)
        : bitmap_(bitmap), previous_(bitmap.fAccess) {
        bitmap_.SetAccess(access);
    }
    ~TAccessScope() { bitmap_.SetAccess(previous_); }
    TAccessScope(const TAccessScope&) = delete;
    TAccessScope& operator=(const TAccessScope&) = delete;

private:
    TZmBitmap& bitmap_;
    TZmDataAccess previous_;
};

}  // namespace zm
