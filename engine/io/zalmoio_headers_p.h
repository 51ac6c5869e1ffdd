#pragma once

#include <cstdint>

namespace zm {

class TStream;

/// The header that lets images follow one another in a stream (TZalmoIO::SetStreamHeaders): 8
/// bytes of magic, padded with zeros, and the length of the data behind it, little-endian.

/// What a look for a header found.
struct TZmStreamHeaderFind {
    bool is_acceptable = true;  ///< false: this type must have a header and there is none
    std::int64_t next = -1;     ///< position behind the image's data; -1 when no header tells
};

/// Skips the header of a type, if there is one. The stream then stands at the image.
TZmStreamHeaderFind SkipStreamHeader(std::int32_t file_type, TStream& stream);

/// Whether saves of the type have a header.
bool HasStreamHeader(std::int32_t file_type);
/// Leaves room for a header at the stream's position; returns that position.
std::int64_t ReserveStreamHeader(TStream& stream);
/// Fills the room when the image is written behind it, and goes to the image's end.
void FillStreamHeader(std::int32_t file_type, TStream& stream, std::int64_t start);

}  // namespace zm
