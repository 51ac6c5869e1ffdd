// The C library's allocator behind a counter. The libraries that the codecs call allocate through
// it as well, so it sees and fails what they do.

#include "tests/codecs/allocprobe.h"

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define ZM_HEAP_IS_TAKEN
#elif defined(__has_feature)
#if __has_feature(address_sanitizer) || __has_feature(thread_sanitizer)
#define ZM_HEAP_IS_TAKEN
#endif
#endif

#ifdef ZM_HEAP_IS_TAKEN

bool zm::test::AllocProbeIsThere() {
    return false;
}

#else

#include <malloc.h>

#include <cerrno>
#include <cstddef>

extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* block, std::size_t size);
void* __libc_memalign(std::size_t alignment, std::size_t size);
void __libc_free(void* block);
}

namespace {

bool Fails() {
    const bool fails = zm::test::AllocationFails();
    if (fails) {
        errno = ENOMEM;
    }
    return fails;
}

std::int64_t BytesOf(void* block) {
    return block != nullptr ? static_cast<std::int64_t>(malloc_usable_size(block)) : 0;
}

void* Count(void* block) {
    zm::test::CountAllocated(BytesOf(block));
    return block;
}

}  // namespace

bool zm::test::AllocProbeIsThere() {
    return true;
}

extern "C" {

void* malloc(std::size_t size) {
    return Fails() ? nullptr : Count(__libc_malloc(size));
}

void* calloc(std::size_t count, std::size_t size) {
    return Fails() ? nullptr : Count(__libc_calloc(count, size));
}

void* realloc(void* block, std::size_t size) {
    if (Fails()) {
        return nullptr;
    }
    zm::test::CountAllocated(-BytesOf(block));
    return Count(__libc_realloc(block, size));
}

void* memalign(std::size_t alignment, std::size_t size) {
    return Fails() ? nullptr : Count(__libc_memalign(alignment, size));
}

void* aligned_alloc(std::size_t alignment, std::size_t size) {
    return memalign(alignment, size);
}

int posix_memalign(void** block, std::size_t alignment, std::size_t size) {
    void* made = memalign(alignment, size);
    if (made == nullptr) {
        return ENOMEM;
    }
    *block = made;
    return 0;
}

void free(void* block) {
    zm::test::CountAllocated(-BytesOf(block));
    __libc_free(block);
}

}  // extern "C"

#endif
