#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>
#include <vector>

#include "engine/foundation/zmdefs.h"

/// What reader and writer of Windows and OS/2 bitmaps share.
namespace zm {

/// How a step of the codec ended; only the public functions turn it into the abort flag.
enum class TBmpStatus : std::uint8_t {
    kOk,
    kTruncated,    ///< the data end too early
    kBadData,      ///< fields that no bitmap file has
    kUnsupported,  ///< a depth, compression or size that this codec does not take
    kTooLarge,     ///< beyond the limits for images
    kNoMemory,
    kWriteFailed,  ///< the target took fewer bytes than it was given
    kStopped,      ///< the caller set the abort flag
};

inline constexpr std::uint32_t kBmpType = 0x4D42;  // "BM" read as a little-endian word
inline constexpr std::uint32_t kBmpFileHeaderBytes = 14;

// Info headers, told apart by their size.
inline constexpr std::uint32_t kBmpCoreHeaderBytes = 12;
inline constexpr std::uint32_t kBmpInfoHeaderBytes = 40;
inline constexpr std::uint32_t kBmpOs2HeaderBytes = 64;
inline constexpr std::uint32_t kBmpV4HeaderBytes = 108;
inline constexpr std::uint32_t kBmpV5HeaderBytes = 124;

// Compression codes.
inline constexpr std::uint32_t kBmpNone = 0;
inline constexpr std::uint32_t kBmpRle8 = 1;
inline constexpr std::uint32_t kBmpRle4 = 2;
inline constexpr std::uint32_t kBmpBitFields = 3;
inline constexpr std::uint32_t kBmpAlphaBitFields = 6;  // with a mask for alpha at every depth

/// Bytes of an uncompressed row: whole 32-bit words.
constexpr std::int64_t BmpRowBytes(std::int32_t width, std::int32_t bit_count) {
    return ((std::int64_t{width} * bit_count + 31) >> 5) * 4;
}

/// A run-length encoded image in memory.
struct TBmpRleImage {
    std::span<const std::uint8_t> data;
    std::int32_t width = 0;
    std::int32_t height = 0;
    std::uint32_t compression = kBmpRle8;  ///< kBmpRle8 or kBmpRle4
};

/// Receives a finished row: its number in file order (0 is the first row of the file) and
/// `width` palette indices.
using TBmpRowSink = std::function<void(std::int32_t file_row, const std::uint8_t* indices)>;
/// Called at the start and after each end of line with the rows done; false stops the decoding.
using TBmpRowStep = std::function<bool(std::int32_t rows_done)>;

/// Decodes RLE4 or RLE8. Every row goes to `sink` exactly once, in order, whatever the outcome:
/// pixels that no run covers have index 0. kTruncated when the data end before the last row was
/// reached and without an end-of-bitmap mark.
[[nodiscard]] TBmpStatus DecodeBmpRle(const TBmpRleImage& image, const TBmpRowSink& sink,
                                      const TBmpRowStep& step);

/// Appends the encoded form of a row of palette indices, with its end-of-line mark, to `output`.
/// RLE4 takes indices 0 to 15.
void EncodeBmpRle8Row(std::span<const std::uint8_t> indices, std::vector<std::uint8_t>& output);
void EncodeBmpRle4Row(std::span<const std::uint8_t> indices, std::vector<std::uint8_t>& output);

}  // namespace zm
