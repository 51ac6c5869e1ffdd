#pragma once

#include <cstdint>
#include <functional>

/// Resizing of pictures by the system's own imaging component.
namespace zm::platform {

/// In the order of the component's own numbers.
enum class TScalerMode : std::uint8_t { kNearest, kLinear, kCubic, kFant };

/// Samples of a pixel as they lie in a row. The channels of a pixel do not mix.
enum class TScalerLayout : std::uint8_t {
    kOneByte,
    kOneWord,
    kOneFloat,
    kThreeBytes,
    kThreeWords,
    kFourBytes,
};

/// A picture to be resized. Sizes are at least 1; rows go from the top down and are packed.
struct TScalerRequest {
    TScalerLayout layout = TScalerLayout::kOneByte;
    TScalerMode mode = TScalerMode::kNearest;
    std::int32_t source_width = 0;
    std::int32_t source_height = 0;
    std::int32_t target_width = 0;
    std::int32_t target_height = 0;
    /// Gives a row of the source, which is copied before the next one is asked for; in any order.
    std::function<const std::uint8_t*(std::int32_t row)> source_row;
    /// Gives the place of a row of the target, each once, from the top down.
    std::function<std::uint8_t*(std::int32_t row)> target_row;
};

/// Resizes on the calling thread, any thread. False when the system has no such component or it
/// does not take the request; what was written is then worth nothing. Exceptions of the two
/// functions pass through, as does std::bad_alloc.
[[nodiscard]] bool ScaleImage(const TScalerRequest& request);

}  // namespace zm::platform
