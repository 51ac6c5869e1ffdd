/// Moves of bytes, those of whole pictures past the caches.

#include "engine/bitmap/zmrunmover_p.h"

#include <cstring>

#include "engine/bitmap/zmxBitmaps.h"

#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "engine/bitmap/zmrunmover.cpp"
#include <hwy/cache_control.h>
#include <hwy/foreach_target.h>
#include <hwy/highway.h>

HWY_BEFORE_NAMESPACE();
namespace zm::HWY_NAMESPACE {

namespace hn = hwy::HWY_NAMESPACE;

/// Stores whole lines of 64 bytes past the caches; `dest` is aligned to them.
void StreamLines(std::uint8_t* dest, const std::uint8_t* source, std::size_t line_count) {
    constexpr std::size_t kLineBytes = 64;
#if HWY_TARGET == HWY_SCALAR || HWY_TARGET == HWY_EMU128
    std::memcpy(dest, source, line_count * kLineBytes);  // no such stores there
#else
    const hn::CappedTag<std::uint8_t, kLineBytes> bytes;
    for (const std::uint8_t* const end = source + line_count * kLineBytes; source < end;
         source += kLineBytes, dest += kLineBytes) {
        for (std::size_t i = 0; i < kLineBytes; i += hn::Lanes(bytes)) {
            hn::Stream(hn::LoadU(bytes, source + i), bytes, dest + i);
        }
    }
#endif
}

}  // namespace zm::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace zm {
namespace {

HWY_EXPORT(StreamLines);

constexpr std::size_t kLineBytes = 64;
/// Of shorter runs the ends, which do not fill a line, are too large a part.
constexpr std::size_t kShortestStreamed = 1024;

/// Whether two runs share no byte.
bool AreApart(const std::uint8_t* a, const std::uint8_t* b, std::size_t count) {
    const auto first = reinterpret_cast<std::uintptr_t>(a);
    const auto second = reinterpret_cast<std::uintptr_t>(b);
    return (first < second ? second - first : first - second) >= count;
}

}  // namespace

bool IsStoredBottomUp(const TZmBitmap& bitmap) {
    const bool is_reversed =
        (bitmap.GetLocation() == zmMemory && bitmap.GetFragmentsCount() == 0) ||
        bitmap.GetLocation() == zmTBitmap;
    return is_reversed == (bitmap.GetOrigin() == zmboBOTTOMLEFT);
}

TRunMover::TRunMover(const TZmBitmap& dest, std::int64_t total_bytes)
    : is_streaming_(total_bytes >= kStreamedBytes && dest.GetLocation() != zmFile) {}

TRunMover::~TRunMover() {
    if (is_streaming_) {
        hwy::FlushStream();
    }
}

void TRunMover::Move(std::uint8_t* dest, const std::uint8_t* source, std::size_t count) const {
    if (!is_streaming_ || count < kShortestStreamed || !AreApart(dest, source, count)) {
        std::memmove(dest, source, count);
        return;
    }
    const std::size_t head = (0 - reinterpret_cast<std::uintptr_t>(dest)) % kLineBytes;
    const std::size_t line_count = (count - head) / kLineBytes;
    const std::size_t done = head + line_count * kLineBytes;
    std::memcpy(dest, source, head);
    HWY_DYNAMIC_DISPATCH(StreamLines)(dest + head, source + head, line_count);
    std::memcpy(dest + done, source + done, count - done);
}

}  // namespace zm
#endif
