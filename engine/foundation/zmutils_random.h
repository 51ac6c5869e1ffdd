#pragma once

#include <cstdint>

namespace zm {

/// Pseudo-random numbers by xorshift over four 32-bit words (G. Marsaglia, "Xorshift RNGs", 2003,
/// section 4); seed 0 gives that text's own sequence. The same seed gives the same numbers
/// everywhere. Not for secrets; not thread-safe.
class TZmRandomGenerator {
public:
    explicit TZmRandomGenerator(std::uint32_t seed)
        : x_(seed ^ 0x075BCD15),
          y_((seed << 8) ^ 0x159A55E5),
          z_((seed << 16) ^ 0x1F123BB5),
          w_((seed << 24) ^ 0x05491333) {}

    std::uint32_t Next() {
        const std::uint32_t t = x_ ^ (x_ << 11);
        x_ = y_;
        y_ = z_;
        z_ = w_;
        w_ = w_ ^ (w_ >> 19) ^ t ^ (t >> 8);
        return w_;
    }
    /// Two draws: the first is the high half.
    std::int64_t NextINT64() {
        const std::uint64_t high = Next();
        return static_cast<std::int64_t>((high << 32) | Next());
    }

private:
    std::uint32_t x_;
    std::uint32_t y_;
    std::uint32_t z_;
    std::uint32_t w_;
};

}  // namespace zm
