#pragma once

#include "engine/io/zmprogress.h"

namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;

/// Reads a wireless bitmap at the stream's position as zm1g. With `params_only` only `params` is
/// filled. Bad data: `*progress.Aborting` true; only what the stream raises passes.
void ReadWBMPStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool params_only,
                    TProgressRec& progress);

/// Writes `bitmap`, a copy of it in zm1g when it has another format. A short write sets
/// `*progress.Aborting`. The bitmap is left as it was.
void WriteWBMPStream(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress);

}  // namespace zm
