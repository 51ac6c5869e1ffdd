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

namespace zm::test {

bool AllocProbeIsThere() {
    return false;
}

TAllocProbe::TAllocProbe() = default;
TAllocProbe::~TAllocProbe() = default;
void TAllocProbe::FailAt(std::int64_t) {}
bool TAllocProbe::HasFailed() const {
    return false;
}
std::int64_t TAllocProbe::LiveBytes() const {
    return 0;
}
std::int64_t TAllocProbe::PeakBytes() const {
    return 0;
}

}  // namespace zm::test

#else

#include <malloc.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>

extern "C" {
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* block, std::size_t size);
void* __libc_memalign(std::size_t alignment, std::size_t size);
void __libc_free(void* block);
}

namespace zm::test {

namespace {

struct TState {
    bool is_watching = false;
    bool has_failed = false;
    std::int64_t until_failure = 0;
    std::int64_t live_bytes = 0;
    std::int64_t peak_bytes = 0;
};

thread_local TState state;

bool Fails() {
    if (!state.is_watching || state.until_failure == 0 || --state.until_failure > 0) {
        return false;
    }
    state.has_failed = true;
    errno = ENOMEM;
    return true;
}

void* Count(void* block) {
    if (state.is_watching && block != nullptr) {
        state.live_bytes += static_cast<std::int64_t>(malloc_usable_size(block));
        state.peak_bytes = std::max(state.peak_bytes, state.live_bytes);
    }
    return block;
}

void Uncount(void* block) {
    if (state.is_watching && block != nullptr) {
        state.live_bytes -= static_cast<std::int64_t>(malloc_usable_size(block));
    }
}

}  // namespace

bool AllocProbeIsThere() {
    return true;
}

TAllocProbe::TAllocProbe() {
    state = {};
    state.is_watching = true;
}

TAllocProbe::~TAllocProbe() {
    state.is_watching = false;
}

void TAllocProbe::FailAt(std::int64_t n) {
    state.until_failure = n;
}

bool TAllocProbe::HasFailed() const {
    return state.has_failed;
}

std::int64_t TAllocProbe::LiveBytes() const {
    return state.live_bytes;
}

std::int64_t TAllocProbe::PeakBytes() const {
    return state.peak_bytes;
}

}  // namespace zm::test

extern "C" {

void* malloc(std::size_t size) {
    return zm::test::Fails() ? nullptr : zm::test::Count(__libc_malloc(size));
}

void* calloc(std::size_t count, std::size_t size) {
    return zm::test::Fails() ? nullptr : zm::test::Count(__libc_calloc(count, size));
}

void* realloc(void* block, std::size_t size) {
    if (zm::test::Fails()) {
        return nullptr;
    }
    zm::test::Uncount(block);
    return zm::test::Count(__libc_realloc(block, size));
}

void* memalign(std::size_t alignment, std::size_t size) {
    return zm::test::Fails() ? nullptr : zm::test::Count(__libc_memalign(alignment, size));
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
    zm::test::Uncount(block);
    __libc_free(block);
}

}  // extern "C"

#endif
