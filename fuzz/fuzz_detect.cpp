// Any bytes as a stream of unknown type: detection finds something or nothing, and leaves the
// stream where it stood.

#include <cstddef>
#include <cstdint>
#include <cstdlib>

#include "engine/foundation/zmstreams.h"
#include "engine/io/zmformatdetect.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    constexpr std::size_t kMaxInputBytes = 1 << 16;
    if (size > kMaxInputBytes) {
        return 0;
    }
    for (const std::int64_t start : {0, 3}) {
        zm::TBorrowedMemoryStream stream(data, static_cast<std::int64_t>(size));
        stream.SetPosition(start);
        const std::int32_t type = zm::FindStreamFormat(stream);
        if (stream.GetPosition() != start || zm::FindStreamFormat(stream) != type) {
            std::abort();
        }
    }
    return 0;
}
