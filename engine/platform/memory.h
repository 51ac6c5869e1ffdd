#pragma once

#include <cstddef>
#include <cstdint>

/// The machine's memory and processor, and the system's own heap. All calls are thread-safe.
namespace zm::platform {

/// Total physical memory in bytes; 0 when the system reports none.
std::int64_t PhysicalMemoryBytes();

/// Physical processor cores, hyper-threads not counted; 1 when the system does not tell.
std::int32_t PhysicalCoreCount();

/// Zero-filled block of the system's heap, or nil. Released by SystemHeapFree with the same size.
void* SystemHeapAllocate(std::size_t size_bytes);
void SystemHeapFree(void* block, std::size_t size_bytes);

}  // namespace zm::platform
