// The control words themselves: the C library's calls speak of both units at once and leave out
// the denormal exception.
#include "engine/platform/fpexceptions.h"

#include <xmmintrin.h>

namespace zm::platform {
namespace {

constexpr unsigned kSseMaskShift = 7;  // place of the masks in the SSE control word

std::uint16_t ReadX87Control() {
    std::uint16_t word = 0;
    __asm__ volatile("fnstcw %0" : "=m"(word));
    return word;
}

void WriteX87Control(std::uint16_t word) {
    __asm__ volatile("fnclex; fldcw %0" : : "m"(word));
}

}  // namespace

TFpMasks GetFpMasks() {
    TFpMasks masks;
    masks.x87 = static_cast<std::uint8_t>(ReadX87Control() & kAllFpExceptions);
    masks.sse = static_cast<std::uint8_t>((_mm_getcsr() >> kSseMaskShift) & kAllFpExceptions);
    return masks;
}

void SetFpMasks(const TFpMasks& masks) {
    constexpr unsigned kAll = kAllFpExceptions;
    WriteX87Control(static_cast<std::uint16_t>((ReadX87Control() & ~kAll) | masks.x87));
    const unsigned kept = _mm_getcsr() & ~(kAll << kSseMaskShift | kAll);
    _mm_setcsr(kept | unsigned{masks.sse} << kSseMaskShift);
}

}  // namespace zm::platform
