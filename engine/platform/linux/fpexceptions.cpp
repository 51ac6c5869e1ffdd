#include "engine/platform/fpexceptions.h"

#include <cfenv>

namespace zm::platform {
namespace {

constexpr unsigned kSseMaskShift = 7;  // place of the masks in the SSE control word

}  // namespace

TFpMasks GetFpMasks() {
    std::fenv_t environment;
    std::fegetenv(&environment);
    TFpMasks masks;
    masks.x87 = static_cast<std::uint8_t>(environment.__control_word & kAllFpExceptions);
    masks.sse =
        static_cast<std::uint8_t>((environment.__mxcsr >> kSseMaskShift) & kAllFpExceptions);
    return masks;
}

void SetFpMasks(const TFpMasks& masks) {
    constexpr unsigned kAll = kAllFpExceptions;
    std::fenv_t environment;
    std::fegetenv(&environment);
    environment.__control_word =
        static_cast<unsigned short>((environment.__control_word & ~kAll) | masks.x87);
    environment.__status_word = static_cast<unsigned short>(environment.__status_word & ~kAll);
    environment.__mxcsr &= ~(kAll << kSseMaskShift | kAll);
    environment.__mxcsr |= unsigned{masks.sse} << kSseMaskShift;
    std::fesetenv(&environment);
}

}  // namespace zm::platform
