#include "engine/platform/icons.h"

namespace zm::platform {

void* CreateIconHandle(const std::uint8_t*, std::size_t, std::int32_t, std::int32_t) {
    return nullptr;
}

void DestroyIconHandle(void*) {}

}  // namespace zm::platform
