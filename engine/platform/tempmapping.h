#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>

namespace zm::platform {

/// A temporary file, gone with the object (also when the process dies), whose windows can be
/// mapped into memory.
class TTemporaryMapping {
public:
    virtual ~TTemporaryMapping() = default;
    /// Changes the file's size; new bytes are 0. No window may be mapped. False without room:
    /// the space is reserved, so that a full disk shows here and not as a fault at a write.
    virtual bool Resize(std::int64_t size_bytes) = 0;
    /// Maps a window; `position` is a multiple of WindowAlignment(). Nil on failure.
    virtual void* MapWindow(std::int64_t position, std::size_t size_bytes) = 0;
    virtual void UnmapWindow(void* window, std::size_t size_bytes) = 0;
};

/// Makes the file in `folder` (empty: the system's folder for temporary files) with
/// `descriptor` in its name; nil on failure.
std::unique_ptr<TTemporaryMapping> CreateTemporaryMapping(const std::u16string& folder,
                                                          const std::string& descriptor,
                                                          std::int64_t size_bytes);

/// Granularity of window positions in bytes, a power of two.
std::size_t WindowAlignment();

}  // namespace zm::platform
