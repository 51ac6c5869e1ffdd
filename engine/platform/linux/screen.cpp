#include "engine/platform/screen.h"

namespace zm::platform {

std::optional<TSystemVersion> SystemVersion() {
    return std::nullopt;
}

TScreenTraits ScreenTraits() {
    return {};
}

bool ProcessorHasMMX() {
#if defined(__i386__) || defined(__x86_64__)
    return __builtin_cpu_supports("mmx") != 0;
#else
    return false;
#endif
}

}  // namespace zm::platform
