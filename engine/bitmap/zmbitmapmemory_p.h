#pragma once

#include <cstdint>

#include "engine/foundation/zmdefs.h"

/// The heaps that memory images take their blocks from.
namespace zm {

/// A block of the runtime's heap (zmmaVCL), of the system's heap, zero-filled (zmmaSystem), or of
/// the runtime's below 1 MiB and the system's from there on (zmmaAuto). Nil without room.
void* AllocateBitmapBlock(TZmMemoryAllocator allocator, std::int64_t size_bytes);
/// Frees a block with the allocator and the size that made it; nil is ignored.
void FreeBitmapBlock(void* block, TZmMemoryAllocator allocator, std::int64_t size_bytes);

/// Whether NoteBlockFilled was called for a block; False too for one of zmmaVCL, which cannot tell.
/// The system clears memory on its first use, which leaves it in the caches: only blocks that were
/// filled before gain from stores past these.
bool WasBlockFilled(const void* block, TZmMemoryAllocator allocator);
void NoteBlockFilled(void* block, TZmMemoryAllocator allocator);

/// Blocks of the system's heap for images in fragments; nil without room.
std::uint8_t* AllocateBitmapFragment(std::int64_t size_bytes);
void FreeBitmapFragment(std::uint8_t* fragment, std::int64_t size_bytes);

/// Larger blocks and fragments are refused as if the heaps had no room for them, so that the ways
/// out (fragments, disk, failure) can be tried. No limit at the start; negative removes it.
void SetLargestBitmapBlock(std::int64_t size_bytes);

}  // namespace zm
