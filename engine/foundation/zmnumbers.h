#pragma once

#include <cmath>
#include <cstdint>
#include <limits>
#include <optional>

/// Rounding, clamping and overflow-checked sizes. A bare float-to-int cast is a fault elsewhere:
/// out-of-range values and not-a-number have a stated result only here.
namespace zm {

inline constexpr std::int32_t kMaxInt32 = std::numeric_limits<std::int32_t>::max();
inline constexpr std::int32_t kMinInt32 = std::numeric_limits<std::int32_t>::min();

/// Truncation toward zero, saturated to 32 bits; not-a-number gives 0.
inline std::int32_t TruncToInt(double value) {
    if (!(value > -2147483649.0)) {
        return std::isnan(value) ? 0 : kMinInt32;
    }
    return value >= 2147483648.0 ? kMaxInt32 : static_cast<std::int32_t>(value);
}

/// Nearest integer, ties to even, saturated to 32 bits; not-a-number gives 0. Relies on the
/// default rounding mode, which the engine never changes.
inline std::int32_t RoundHalfEven(double value) {
    return TruncToInt(std::nearbyint(value));
}

constexpr std::uint8_t Clamp8(std::int32_t value) {
    return static_cast<std::uint8_t>(value < 0 ? 0 : value > 255 ? 255 : value);
}

constexpr std::uint16_t Clamp16(std::int32_t value) {
    return static_cast<std::uint16_t>(value < 0 ? 0 : value > 65535 ? 65535 : value);
}

/// Limits a 64-bit value to 32 bits.
constexpr std::int32_t SaturateToInt32(std::int64_t value) {
    return value < kMinInt32   ? kMinInt32
           : value > kMaxInt32 ? kMaxInt32
                               : static_cast<std::int32_t>(value);
}

/// The 32-bit product as the processor gives it, the high bits dropped.
constexpr std::int32_t WrapMul32(std::int32_t a, std::int32_t b) {
    const std::uint32_t product = static_cast<std::uint32_t>(a) * static_cast<std::uint32_t>(b);
    return static_cast<std::int32_t>(product);
}

/// a * b, or nothing when the product exceeds 64 signed bits or an operand is negative.
constexpr std::optional<std::int64_t> CheckedMul(std::int64_t a, std::int64_t b) {
    if (a < 0 || b < 0) {
        return std::nullopt;
    }
    if (b != 0 && a > std::numeric_limits<std::int64_t>::max() / b) {
        return std::nullopt;
    }
    return a * b;
}

/// Whether a byte count can be one block of this process's address space.
constexpr bool FitsAddressSpace(std::int64_t bytes) {
    return bytes >= 0 &&
           static_cast<std::uint64_t>(bytes) <= std::numeric_limits<std::size_t>::max() / 2;
}

}  // namespace zm
