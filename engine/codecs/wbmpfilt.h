#pragma once

#include "engine/io/zmprogress.h"

namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;

/// Reads a wireless bitmap at the stream's position as zm1g. With `params_only` only `params` is
/// filled. Bad data or a stream that raises: `*progress.Aborting` true; nothing is raised.
void ReadWBMPStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool params_only,
                    TProgressRec& progress);

/// Writes `bitmap`, a copy of it in zm1g when it has another format. A failed write sets
/// `*progress.Aborting`; nothing is raised. The bitmap is left as it was.
void WriteWBMPStream(TStream& stream, TZmBitmap& bitmap, TProgressRec& progress);

}  // namespace zm
