#include "engine/platform/process.h"

#include <windows.h>

namespace zm::platform {

bool ProcessIsEnding() {
    // The one question that tells a process's end from an unload; exported by the system's base
    // library in all versions, declared in no header.
    using TShutdownQuery = BOOLEAN(WINAPI*)();
    const HMODULE base_library = GetModuleHandleW(L"ntdll.dll");
    if (base_library == nullptr) {
        return false;
    }
    const auto query = reinterpret_cast<TShutdownQuery>(
        reinterpret_cast<void*>(GetProcAddress(base_library, "RtlDllShutdownInProgress")));
    return query != nullptr && query() != FALSE;
}

}  // namespace zm::platform
