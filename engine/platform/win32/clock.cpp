#include "engine/platform/clock.h"

#include <windows.h>

namespace zm::platform {

TLocalTime LocalNow() {
    SYSTEMTIME now{};
    GetLocalTime(&now);
    return {now.wYear, now.wMonth, now.wDay, now.wHour, now.wMinute, now.wSecond};
}

}  // namespace zm::platform
