#pragma once

#include <array>
#include <cstdint>
#include <span>
#include <string_view>

#include "engine/foundation/zmbytereader.h"

namespace zm {

class TStream;

/// The stream under examination: bytes by their offset from the starting position, through one
/// window that a test may move.
class TDetectSource {
public:
    static constexpr std::int64_t kWindowBytes = 4096;

    explicit TDetectSource(TStream& stream);
    /// Leaves the stream where it stood, also when a read raises.
    ~TDetectSource();
    TDetectSource(const TDetectSource&) = delete;
    TDetectSource& operator=(const TDetectSource&) = delete;
    /// Bytes from the starting position on.
    std::int64_t Size() const { return size_; }
    /// The same as the 32-bit signed number that the size limits compare.
    std::int32_t LimitSize() const { return static_cast<std::int32_t>(size_); }
    /// `count` (at most kWindowBytes) bytes at an offset; fewer at the stream's end. Valid until
    /// the next call.
    std::span<const std::uint8_t> BytesAt(std::int64_t offset, std::int64_t count);
    /// Reader over `count` bytes at the start; it has failed before its first read when the
    /// stream is shorter.
    TZmByteReader Header(std::int64_t count);
    /// Byte at an offset, or -1 behind the end.
    std::int32_t ByteAt(std::int64_t offset);
    /// Moves the stream itself back to the starting position.
    void Rewind();
    TStream& Stream() { return *stream_; }

private:
    void MoveWindow(std::int64_t offset);

    TStream* stream_;
    std::int64_t start_;
    std::int64_t size_;
    std::int64_t window_offset_ = 0;
    std::int64_t window_filled_ = -1;
    std::array<std::uint8_t, kWindowBytes> window_;
};

// Tests of one format each: true when the bytes are such an image's.
bool HasZeroPaddedMagic(TDetectSource& source, std::string_view magic, std::int64_t read_bytes);
bool IsGIF(TDetectSource& source);
bool IsBMP(TDetectSource& source);
bool IsPCX(TDetectSource& source);
/// "II" order only, with the five tags that every such file has.
bool IsHDPhoto(TDetectSource& source);
bool IsTIFF(TDetectSource& source);
/// A TIFF by its form that holds a camera's raw data; asked of what IsTIFF has recognised.
bool IsCameraRawTIFF(TDetectSource& source);
bool IsPNG(TDetectSource& source);
bool IsDICOM(TDetectSource& source);
bool IsIconDirectory(TDetectSource& source, std::uint16_t type_word);
bool IsTGA(TDetectSource& source);
bool IsPXM(TDetectSource& source);
bool IsJP2(TDetectSource& source);
bool IsJ2K(TDetectSource& source);
bool IsAVI(TDetectSource& source);
bool IsDCX(TDetectSource& source);
bool IsWMF(TDetectSource& source);
bool IsEMF(TDetectSource& source);
bool IsPSD(TDetectSource& source);
bool IsVectorObjects(TDetectSource& source, std::int64_t offset);
bool IsLayers(TDetectSource& source, std::int64_t offset);
bool IsLayersAndVectors(TDetectSource& source);
bool HasRawSignature(TDetectSource& source);
/// Offset of a JPEG's start among the first 150 positions, or -1.
std::int32_t FindJPEGStart(TDetectSource& source);

}  // namespace zm
