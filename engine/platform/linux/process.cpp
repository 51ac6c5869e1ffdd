#include "engine/platform/process.h"

namespace zm::platform {

// At exit the clean-up functions run in the reverse order of loading, on the exiting thread, with
// every library still mapped.
bool ProcessIsEnding() {
    return false;
}

}  // namespace zm::platform
