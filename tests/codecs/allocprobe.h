#pragma once

#include <cstdint>

/// The heap of the calling thread under watch: bytes in use, and allocations that fail on wish.
namespace zm::test {

/// Whether this build can watch the heap; sanitizers and some systems keep it to themselves.
bool AllocProbeIsThere();

/// While one lives, allocations and releases of this thread are counted. One at a time.
class TAllocProbe {
public:
    TAllocProbe();
    ~TAllocProbe();
    TAllocProbe(const TAllocProbe&) = delete;
    TAllocProbe& operator=(const TAllocProbe&) = delete;

    /// The n-th allocation from now on (from 1) fails, once; 0 for none.
    void FailAt(std::int64_t n);
    /// Whether one has failed.
    bool HasFailed() const;
    std::int64_t LiveBytes() const;
    std::int64_t PeakBytes() const;
};

// What the stand-in of the allocator tells: whether the present allocation is to fail, and bytes
// that came into use or, negative, went out of it.
bool AllocationFails();
void CountAllocated(std::int64_t bytes);

}  // namespace zm::test
