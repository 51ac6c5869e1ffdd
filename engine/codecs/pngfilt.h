#pragma once

#include <cstdint>

#include "engine/io/zmprogress.h"

namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;
class TZmMask;

/// Reads a PNG at the stream's position. With `params_only` only `params` is filled. Bad data:
/// `*progress.Aborting` true; nothing is raised.
void ReadPNGStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool params_only,
                   TProgressRec& progress);

/// Writes `bitmap`; `alpha` is an 8-bit mask of the image's size or nil. Raises EZmException
/// "Error on creating PNG" when the library cannot start; any later failure sets
/// `*progress.Aborting`. The bitmap is left as it was.
void WritePNGStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, TZmMask* alpha,
                    TProgressRec& progress);

/// The same with the bitmap's own alpha plane, row by row; pixels that the plane does not cover
/// are opaque.
void WritePNGStreamWithAlpha(TStream& stream, TZmBitmap& bitmap, TIOParams& params,
                             TProgressRec& progress);

}  // namespace zm
