#pragma once

#include <cstdint>

/// The processor's floating-point exceptions, of the calling thread.
namespace zm::platform {

/// Bits of a mask, in the order of the processor's control words. A set bit means that the
/// exception is masked: the operation gives a default result and the program goes on.
enum TFpException : std::uint8_t {
    fpInvalid = 1,
    fpDenormal = 2,
    fpZeroDivide = 4,
    fpOverflow = 8,
    fpUnderflow = 16,
    fpInexact = 32,
};
inline constexpr std::uint8_t kAllFpExceptions = 63;

/// Masks of the two arithmetic units.
struct TFpMasks {
    std::uint8_t x87 = kAllFpExceptions;
    std::uint8_t sse = kAllFpExceptions;
    friend bool operator==(const TFpMasks&, const TFpMasks&) = default;
};

TFpMasks GetFpMasks();
/// Sets both masks. Exceptions that are still pending are dropped, so that none is raised late.
void SetFpMasks(const TFpMasks& masks);

}  // namespace zm::platform
