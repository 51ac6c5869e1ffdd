#include "tests/codecs/allocprobe.h"

#include <algorithm>

// The counters, whatever stands in for the allocator.
namespace zm::test {

namespace {

struct TState {
    bool is_watching = false;
    bool has_failed = false;
    std::int64_t until_failure = 0;
    std::int64_t live_bytes = 0;
    std::int64_t peak_bytes = 0;
};

thread_local TState state;

}  // namespace

bool AllocationFails() {
    if (!state.is_watching || state.until_failure == 0 || --state.until_failure > 0) {
        return false;
    }
    state.has_failed = true;
    return true;
}

void CountAllocated(std::int64_t bytes) {
    if (state.is_watching) {
        state.live_bytes += bytes;
        state.peak_bytes = std::max(state.peak_bytes, state.live_bytes);
    }
}

TAllocProbe::TAllocProbe() {
    state = {};
    state.is_watching = true;
}

TAllocProbe::~TAllocProbe() {
    state.is_watching = false;
}

void TAllocProbe::FailAt(std::int64_t n) {
    state.until_failure = n;
}

bool TAllocProbe::HasFailed() const {
    return state.has_failed;
}

std::int64_t TAllocProbe::LiveBytes() const {
    return state.live_bytes;
}

std::int64_t TAllocProbe::PeakBytes() const {
    return state.peak_bytes;
}

}  // namespace zm::test
