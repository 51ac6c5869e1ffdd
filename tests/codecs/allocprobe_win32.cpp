#include "tests/codecs/allocprobe.h"

// The C library of this system is shared with the whole process and cannot be stood in for.
namespace zm::test {

bool AllocProbeIsThere() {
    return false;
}

TAllocProbe::TAllocProbe() = default;
TAllocProbe::~TAllocProbe() = default;
void TAllocProbe::FailAt(std::int64_t) {}
bool TAllocProbe::HasFailed() const {
    return false;
}
std::int64_t TAllocProbe::LiveBytes() const {
    return 0;
}
std::int64_t TAllocProbe::PeakBytes() const {
    return 0;
}

}  // namespace zm::test
