#include "engine/bitmap/zmbitmapmemory_p.h"

#include <atomic>
#include <cstdlib>
#include <limits>

#include "engine/foundation/zmnumbers.h"
#include "engine/platform/memory.h"

namespace zm {
namespace {

constexpr std::int64_t kAutoSystemHeapBytes = 1048576;
constexpr std::int64_t kMarkerBytes = 4;  // where from, whether filled, two unused
constexpr std::uint8_t kMarkerRuntime = 0;
constexpr std::uint8_t kMarkerSystem = 1;
constexpr std::int64_t kNoLimit = std::numeric_limits<std::int64_t>::max();

std::atomic<std::int64_t> largest_block{kNoLimit};

bool IsAllowed(std::int64_t size_bytes) {
    return size_bytes > 0 && size_bytes <= largest_block.load(std::memory_order_relaxed) &&
           size_bytes <= kNoLimit - kMarkerBytes && FitsAddressSpace(size_bytes + kMarkerBytes);
}

void* AllocateMarked(bool from_system, std::int64_t size_bytes) {
    const auto bytes = static_cast<std::size_t>(size_bytes + kMarkerBytes);
    void* const block = from_system ? platform::SystemHeapAllocate(bytes) : std::malloc(bytes);
    if (block == nullptr) {
        return nullptr;
    }
    auto* const first = static_cast<std::uint8_t*>(block);
    first[0] = from_system ? kMarkerSystem : kMarkerRuntime;
    first[1] = 0;
    return first + kMarkerBytes;
}

}  // namespace

void* AllocateBitmapBlock(TZmMemoryAllocator allocator, std::int64_t size_bytes) {
    if (!IsAllowed(size_bytes)) {
        return nullptr;
    }
    if (allocator == zmmaVCL) {
        return std::malloc(static_cast<std::size_t>(size_bytes));
    }
    return AllocateMarked(allocator == zmmaSystem || size_bytes >= kAutoSystemHeapBytes,
                          size_bytes);
}

void FreeBitmapBlock(void* block, TZmMemoryAllocator allocator, std::int64_t size_bytes) {
    if (block == nullptr) {
        return;
    }
    if (allocator == zmmaVCL) {
        std::free(block);
        return;
    }
    std::uint8_t* const first = static_cast<std::uint8_t*>(block) - kMarkerBytes;
    if (*first == kMarkerSystem) {
        platform::SystemHeapFree(first, static_cast<std::size_t>(size_bytes + kMarkerBytes));
    } else {
        std::free(first);
    }
}

bool WasBlockFilled(const void* block, TZmMemoryAllocator allocator) {
    return block != nullptr && allocator != zmmaVCL &&
           static_cast<const std::uint8_t*>(block)[1 - kMarkerBytes] != 0;
}

void NoteBlockFilled(void* block, TZmMemoryAllocator allocator) {
    if (block != nullptr && allocator != zmmaVCL) {
        static_cast<std::uint8_t*>(block)[1 - kMarkerBytes] = 1;
    }
}

std::uint8_t* AllocateBitmapFragment(std::int64_t size_bytes) {
    if (!IsAllowed(size_bytes)) {
        return nullptr;
    }
    return static_cast<std::uint8_t*>(
        platform::SystemHeapAllocate(static_cast<std::size_t>(size_bytes)));
}

void FreeBitmapFragment(std::uint8_t* fragment, std::int64_t size_bytes) {
    if (fragment != nullptr) {
        platform::SystemHeapFree(fragment, static_cast<std::size_t>(size_bytes));
    }
}

void SetLargestBitmapBlock(std::int64_t size_bytes) {
    largest_block.store(size_bytes < 0 ? kNoLimit : size_bytes, std::memory_order_relaxed);
}

}  // namespace zm
