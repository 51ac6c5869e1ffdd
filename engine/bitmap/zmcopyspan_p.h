#pragma once

#include <algorithm>
#include <cstdint>
#include <optional>

namespace zm {

/// One axis of a copy of a rectangle, in 64 bits so that no sum of coordinates overflows.
struct TZmCopySpan {
    std::int64_t source = 0;
    std::int64_t dest = 0;
    std::int64_t length = 0;
};

/// Clips one axis: a negative destination shortens the run and advances the source, a negative
/// source starts at 0. Nothing when the run misses the source or the destination.
inline std::optional<TZmCopySpan> ClipCopySpan(TZmCopySpan span, std::int64_t source_size,
                                               std::int64_t dest_size) {
    if (span.dest < 0) {
        span.length += span.dest;
        span.source -= span.dest;
        span.dest = 0;
    }
    if (span.length <= 0 || span.dest >= dest_size || span.source >= source_size ||
        span.source + span.length <= 0) {
        return std::nullopt;
    }
    span.source = std::max<std::int64_t>(span.source, 0);
    span.length = std::min({span.length, source_size - span.source, dest_size - span.dest});
    return span;
}

}  // namespace zm
