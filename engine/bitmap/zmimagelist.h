#pragma once

#include <cstdint>
#include <memory>

#include "engine/bitmap/zmplatformbitmap.h"

namespace zm {

/// A list of pictures as the platform's controls keep it. Systems differ in what stands behind
/// it, and some have none: whoever has a list implements this.
class TImageList {
public:
    virtual ~TImageList() = default;
    /// Takes a picture over; its index, or -1 when the list does not take it.
    virtual std::int32_t Add(std::unique_ptr<TBitmap> Image) = 0;
};

}  // namespace zm
