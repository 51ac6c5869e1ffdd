#include "engine/platform/screen.h"

#include <windows.h>

namespace zm::platform {

std::optional<TSystemVersion> SystemVersion() {
    OSVERSIONINFOW info{};
    info.dwOSVersionInfoSize = sizeof(info);
    if (GetVersionExW(&info) == FALSE) {
        return std::nullopt;
    }
    return TSystemVersion{info.dwPlatformId, info.dwMajorVersion, info.dwMinorVersion};
}

TScreenTraits ScreenTraits() {
    TScreenTraits traits;
    if (const HDC screen = GetDC(nullptr)) {
        traits.bits_per_pixel = GetDeviceCaps(screen, BITSPIXEL);
        traits.dpi_x = GetDeviceCaps(screen, LOGPIXELSX);
        traits.dpi_y = GetDeviceCaps(screen, LOGPIXELSY);
        ReleaseDC(nullptr, screen);
    }
    traits.edge_x = GetSystemMetrics(SM_CXEDGE);
    traits.edge_y = GetSystemMetrics(SM_CYEDGE);
    traits.border_x = GetSystemMetrics(SM_CXBORDER);
    traits.border_y = GetSystemMetrics(SM_CYBORDER);
    traits.vertical_scroll_width = GetSystemMetrics(SM_CXVSCROLL);
    traits.horizontal_scroll_height = GetSystemMetrics(SM_CYHSCROLL);
    traits.is_remote_session = GetSystemMetrics(SM_REMOTESESSION) != 0;
    return traits;
}

std::uint32_t SystemColor(std::uint8_t number) {
    return GetSysColor(number);
}

bool ProcessorHasMMX() {
    return IsProcessorFeaturePresent(PF_MMX_INSTRUCTIONS_AVAILABLE) != FALSE;
}

}  // namespace zm::platform
