#pragma once

#include <cstdint>
#include <span>
#include <stdexcept>

#include "engine/io/zmprogress.h"

namespace zm {

class TIOParams;
class TStream;
class TZmBitmap;

/// A fatal error of the JPEG library, with the library's text of the message number.
class EZmJpegException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

struct TJpegReadOptions {
    std::int64_t byte_limit = -1;  ///< bytes that belong to the image; -1 for no limit
    bool native_format = false;    ///< keep grey and CMYK pixels as they are
    bool params_only = false;      ///< fill the parameters and leave the bitmap alone
    bool read_metadata = true;     ///< parse EXIF, IPTC, XMP and profile markers
    bool keep_ycbcr = false;       ///< samples of YCbCr files in zm24RGB, Y in the first byte
};

/// Reads a JPEG; markers, resolution and colour space go to `params`, the image is turned upright
/// when `params.fJPEG_EnableAdjustOrientation` asks for it, and warnings are counted there. With
/// fJPEG_GetExifThumbnail the embedded thumbnail comes instead of the image, where there is one.
/// Up to 149 bytes of junk before it are skipped. Bad data, also data that end
/// before the last row: `*progress.Aborting` true; nothing is raised.
void ReadJPEGStream(TStream& stream, TZmBitmap& bitmap, const TJpegReadOptions& options,
                    TProgressRec& progress, TIOParams& params);

/// Writes `bitmap` as `params` tells. An empty bitmap is not written. A failing write sets
/// `*progress.Aborting`; errors of the library raise EZmJpegException. The bitmap is left as it
/// was.
void WriteJPEGStream(TStream& stream, TZmBitmap& bitmap, TIOParams& params, TProgressRec& progress);

/// Metadata that can be exchanged in a file.
enum TJpegBlock : std::uint8_t {
    kJpegBlockIptc,  ///< resource blocks in APP13
    kJpegBlockExif,  ///< EXIF in APP1
};

/// Copies a JPEG to `output`, which is another stream, with `data` (the bytes of a whole marker,
/// prefix included) in the place of each such block that it has; empty data only take those out.
/// All else stays as it is, but junk in front is left out. False for what is no JPEG, for data
/// that fit no marker and for a failed write; `output` is then undefined. Raises what the
/// streams raise.
[[nodiscard]] bool ExchangeJpegBlock(TStream& input, TStream& output, TJpegBlock block,
                                     std::span<const std::uint8_t> data);

}  // namespace zm
