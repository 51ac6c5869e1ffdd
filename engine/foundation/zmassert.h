#pragma once

/// ZM_ASSERT(condition): an invariant of our own code. It stops debug, test and fuzz builds with
/// the place and the text of the condition; release builds do not evaluate it.
namespace zm {
[[noreturn]] void AssertFailed(const char* condition, const char* file, int line);
}

#if defined(NDEBUG) && !defined(ZM_FORCE_ASSERTS)
#define ZM_ASSERT(condition) static_cast<void>(0)
#else
#define ZM_ASSERT(condition) \
    ((condition) ? static_cast<void>(0) : ::zm::AssertFailed(#condition, __FILE__, __LINE__))
#endif
