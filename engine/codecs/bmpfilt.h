#pragma once

#include <cstdint>

#include "engine/io/zmprogress.h"

namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;
class TZmMask;

/// Reads a Windows or OS/2 bitmap at the stream's position into `bitmap`.
/// `byte_limit`: bytes that belong to the image, 0 for no limit. `alpha`: receives an 8-bit mask
/// when a 32-bit file holds alpha and `ignore_alpha` is false; else it stays without a size.
/// `no_file_header`: the stream starts at the info header (icons). `params_only`: fill `params`
/// and leave the bitmap alone. Bad data: `*progress.Aborting` true; nothing is raised.
void ReadBMPStream(TStream& stream, TZmBitmap& bitmap, std::int64_t byte_limit, bool ignore_alpha,
                   TZmMask& alpha, bool no_file_header, bool params_only, TProgressRec& progress,
                   TIOParams& params);

/// Writes `bitmap` as `params` tells (depth, version, compression). Alpha goes to the file only
/// with `handle_transparency`. The bitmap is left as it was. A failed write sets
/// `*progress.Aborting`; nothing is raised.
void WriteBMPStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, bool handle_transparency,
                    TProgressRec& progress);

}  // namespace zm
