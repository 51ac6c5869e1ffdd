#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>

/// The raw form of a bitmap in memory and in streams: the library's own clipboard format, and its
/// undo. All numbers are little-endian.
///
///     0        12  "TZMBITMAPRAW"
///     12        4  version, written as 0; a negative one is refused
///     16        4  P, number of palette entries, at most 256
///     20       3P  palette: blue, green, red
///     20 + 3P   4  width
///               4  height
///               1  TZmPixelFormat ordinal
///               1  fFull
///               4  fPaletteUsed
///               8  fBlackValue     (a Double, as the next)
///               8  fWhiteValue
///              16  fChannelOffset, four integers
///               1  fEnableChannelOffset
///               4  fContrast
///               4  fBitAlignment
///        height rows of fRowLen bytes, from row 0 on; padding is written as 0
///               1  1 when an alpha plane follows, else 0
///        height rows of the plane, one byte a pixel, aligned to 32 bits
///               1  fFull of the plane
///
/// Flags are 0 or 1. Members of TZmBitmap:
///
/// CalcRAWSize: the bytes of all that, -1 when they exceed 2^31 - 1.
///
/// SaveRAWToBufferOrStream: to a buffer of `buffer_bytes` bytes, or, when that is nil, to the
/// stream. False when the buffer is too small or the stream takes less. Whether the stream has
/// its size already makes no difference to the bytes. Where a plane has no pixel for one of the
/// image, an opaque one is written.
///
/// LoadRAWFromBufferOrStream: from `buffer_bytes` bytes, or, when `Buffer` is nil, from the
/// stream's position on. Every field is checked: False for another magic, a negative version,
/// values that no bitmap has (sizes below 1, an alignment that is no power of two from 8 to 1024,
/// a format without pixels, a palette of more than 256 entries, a range that is no number), for
/// data that end too soon, without room, for a virtual bitmap, and for a format that the platform
/// bitmap of this one cannot hold. The stream is then where it was; else it is behind the blob.
namespace zm {

class TZmBitmap;

inline constexpr std::size_t kRawMagicBytes = 12;
inline constexpr std::size_t kRawHeadBytes = 20;    ///< magic, version, P
inline constexpr std::size_t kRawFieldsBytes = 55;  ///< width to fBitAlignment

/// Bytes of a bitmap's raw form; nothing when a row exceeds 2^31 - 1. TZmBitmap::CalcRAWSize is
/// the same in 32 bits.
std::optional<std::int64_t> CalcRawBlobBytes(TZmBitmap& bitmap);

}  // namespace zm
