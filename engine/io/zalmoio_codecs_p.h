#pragma once

#include <cstdint>

#include "engine/bitmap/zmpixelformats.h"
#include "engine/foundation/zmdefs.h"
#include "engine/io/zmprogress.h"

/// The codecs as the driver calls them: one row of a table each (zalmoio_codecs.cpp).
namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;
class TZmMask;

/// What a codec is handed.
struct TZmLoadCall {
    TStream& stream;  ///< stands at the image
    TZmBitmap& bitmap;
    TIOParams& params;
    TProgressRec& progress;
    TColor& background;  ///< the driver's own, for formats that carry one
    bool params_only;    ///< fill the parameters and leave the bitmap alone
    TZmMask& alpha;      ///< a mask with a size on return is the image's alpha
};

struct TZmSaveCall {
    TStream& stream;
    TZmBitmap& bitmap;  ///< of a format that the codec accepts; it is left as it was
    TIOParams& params;
    TProgressRec& progress;
    TColor& background;
};

struct TZmLoadCodec {
    std::int32_t type;
    void (*read)(TZmLoadCall& call);
};

struct TZmSaveCodec {
    std::int32_t type;
    /// Bitmaps of other formats are handed over as a copy in zm24RGB; empty: all are accepted.
    TZmPixelFormatSet accepted;
    void (*write)(TZmSaveCall& call);
};

/// Formats that writers of colour images take as they stand.
inline constexpr TZmPixelFormatSet kColorOrTwoLevels(zm24RGB, zm1g);

/// The codec of a type; nil when there is none.
const TZmLoadCodec* FindLoadCodec(std::int32_t file_type);
const TZmSaveCodec* FindInternalSaveCodec(std::int32_t file_type);

}  // namespace zm
