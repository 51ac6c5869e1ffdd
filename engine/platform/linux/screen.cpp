#include "engine/platform/screen.h"

#include <array>

namespace zm::platform {

std::optional<TSystemVersion> SystemVersion() {
    return std::nullopt;
}

TScreenTraits ScreenTraits() {
    return {};
}

std::uint32_t SystemColor(std::uint8_t number) {
    constexpr std::array<std::uint32_t, 31> kColors = {
        0xC8C8C8, 0x000000, 0xD1B499, 0xDBCDBF, 0xF0F0F0, 0xFFFFFF, 0x646464, 0x000000,
        0x000000, 0x000000, 0xB4B4B4, 0xFCF7F4, 0xABABAB, 0xD77800, 0xFFFFFF, 0xF0F0F0,
        0xA0A0A0, 0x6D6D6D, 0x000000, 0x000000, 0xFFFFFF, 0x696969, 0xE3E3E3, 0x000000,
        0xE1FFFF, 0x000000, 0xCC6600, 0xEAD1B9, 0xF2E4D7, 0xD77800, 0xF0F0F0};
    return number < kColors.size() ? kColors[number] : 0;
}

bool ProcessorHasMMX() {
#if defined(__i386__) || defined(__x86_64__)
    return __builtin_cpu_supports("mmx") != 0;
#else
    return false;
#endif
}

}  // namespace zm::platform
