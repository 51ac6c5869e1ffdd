#pragma once

#include <cstddef>
#include <cstdint>

namespace zm {

class TZmBitmap;

/// From so many bytes on a copy goes past the caches: what it writes first would have left them
/// before the end, and a line that is stored whole need not be read first.
inline constexpr std::int64_t kStreamedBytes = 8 << 20;

/// Whether the rows of a bitmap lie from the last to the first at growing addresses. Work that
/// follows the memory is faster than work that goes against it.
bool IsStoredBottomUp(const TZmBitmap& bitmap);

/// Moves runs of bytes into rows of a bitmap whose memory was in use before. (The system clears
/// memory on its first use, which leaves it in the caches: plain copies are faster there.)
class TRunMover {
public:
    /// `total_bytes`: of all runs together.
    TRunMover(const TZmBitmap& dest, std::int64_t total_bytes);
    /// Ends what went past the caches, for the eyes of other threads.
    ~TRunMover();
    TRunMover(const TRunMover&) = delete;
    TRunMover& operator=(const TRunMover&) = delete;

    /// Whether long runs go past the caches.
    bool IsStreaming() const { return is_streaming_; }
    /// The two runs may overlap.
    void Move(std::uint8_t* dest, const std::uint8_t* source, std::size_t count) const;

private:
    bool is_streaming_;
};

}  // namespace zm
