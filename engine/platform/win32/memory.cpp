#include "engine/platform/memory.h"

#include <windows.h>

#include <algorithm>
#include <cstring>
#include <limits>
#include <vector>

namespace zm::platform {
namespace {

using TGetProcessorInformation = BOOL(WINAPI*)(SYSTEM_LOGICAL_PROCESSOR_INFORMATION*, DWORD*);
static_assert(sizeof(SYSTEM_LOGICAL_PROCESSOR_INFORMATION) == 24);

/// By name, because the oldest systems lack the function.
TGetProcessorInformation FindGetProcessorInformation() {
    const HMODULE kernel = GetModuleHandleW(L"Kernel32.dll");
    const FARPROC address =
        kernel == nullptr ? nullptr : GetProcAddress(kernel, "GetLogicalProcessorInformation");
    return reinterpret_cast<TGetProcessorInformation>(reinterpret_cast<void*>(address));
}

}  // namespace

std::int64_t PhysicalMemoryBytes() {
    MEMORYSTATUSEX status{};
    status.dwLength = sizeof(status);
    if (GlobalMemoryStatusEx(&status) == FALSE) {
        return 0;
    }
    constexpr DWORDLONG kMost = std::numeric_limits<std::int64_t>::max();
    return static_cast<std::int64_t>(std::min<DWORDLONG>(status.ullTotalPhys, kMost));
}

std::int32_t PhysicalCoreCount() {
    const TGetProcessorInformation get_information = FindGetProcessorInformation();
    DWORD size_bytes = 0;
    if (get_information == nullptr || get_information(nullptr, &size_bytes) != FALSE ||
        GetLastError() != ERROR_INSUFFICIENT_BUFFER) {
        return 1;
    }
    constexpr DWORD kEntryBytes = sizeof(SYSTEM_LOGICAL_PROCESSOR_INFORMATION);
    std::vector<SYSTEM_LOGICAL_PROCESSOR_INFORMATION> entries(size_bytes / kEntryBytes + 1);
    size_bytes = static_cast<DWORD>(entries.size()) * kEntryBytes;
    if (get_information(entries.data(), &size_bytes) == FALSE) {
        return 1;
    }
    const auto end = entries.begin() + static_cast<std::ptrdiff_t>(size_bytes / kEntryBytes);
    const auto cores = std::count_if(entries.begin(), end, [](const auto& entry) {
        return entry.Relationship == RelationProcessorCore;
    });
    return static_cast<std::int32_t>(std::max<std::ptrdiff_t>(cores, 1));
}

void* SystemHeapAllocate(std::size_t size_bytes) {
    return size_bytes == 0 ? nullptr : GlobalAlloc(GMEM_FIXED | GMEM_ZEROINIT, size_bytes);
}

void SystemHeapFree(void* block, std::size_t) {
    if (block != nullptr) {
        GlobalFree(block);
    }
}

}  // namespace zm::platform
