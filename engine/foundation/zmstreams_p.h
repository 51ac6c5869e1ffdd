#pragma once

#include <algorithm>
#include <cstdint>

#include "engine/foundation/zmstreams.h"
#include "engine/platform/files.h"

/// What the streams over an open file share: a failure of the system is no byte, and no move.
namespace zm {

inline std::int32_t ReadOrNothing(platform::TFileHandle& file, void* buffer, std::int32_t count) {
    return std::max(file.Read(buffer, count), 0);
}

inline std::int32_t WriteOrNothing(platform::TFileHandle& file, const void* buffer,
                                   std::int32_t count) {
    return std::max(file.Write(buffer, count), 0);
}

/// The new position, or the present one.
inline std::int64_t SeekOrStay(platform::TFileHandle& file, std::int64_t offset,
                               TSeekOrigin origin) {
    const std::int64_t position = file.Seek(offset, origin);
    return position >= 0 ? position : std::max<std::int64_t>(file.Seek(0, soCurrent), 0);
}

inline std::int64_t SizeOrNothing(platform::TFileHandle& file) {
    return std::max<std::int64_t>(file.GetSize(), 0);
}

}  // namespace zm
