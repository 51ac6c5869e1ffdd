#include "engine/foundation/zmassert.h"

#include <cstdio>
#include <cstdlib>

namespace zm {

void AssertFailed(const char* condition, const char* file, int line) {
    std::fprintf(stderr, "%s:%d: broken invariant: %s\n", file, line, condition);
    std::abort();
}

}  // namespace zm
