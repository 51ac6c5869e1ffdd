#include "engine/platform/icons.h"

#include <windows.h>

namespace zm::platform {
namespace {

constexpr DWORD kIconImageVersion = 0x00030000;

}  // namespace

void* CreateIconHandle(const std::uint8_t* image, std::size_t size_bytes, std::int32_t width,
                       std::int32_t height) {
    // The system takes the bytes as writable and only reads them.
    return CreateIconFromResourceEx(const_cast<PBYTE>(image), static_cast<DWORD>(size_bytes),
                                    /*fIcon=*/TRUE, kIconImageVersion, width, height,
                                    LR_DEFAULTCOLOR);
}

void DestroyIconHandle(void* icon) {
    if (icon != nullptr) {
        DestroyIcon(static_cast<HICON>(icon));
    }
}

}  // namespace zm::platform
