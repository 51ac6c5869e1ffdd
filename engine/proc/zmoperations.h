#pragma once

#include <cstdint>
#include <string>

/// Operations of the processing library, by the numbers that undo states carry. Stored states
/// and listeners know the numbers, so they never change.
namespace zm {

inline constexpr std::int32_t kOperationNone = 0;
inline constexpr std::int32_t kOperationConvertColors = 26;  ///< caption with %d, a count
inline constexpr std::int32_t kOperationFlipHorizontal = 48;
inline constexpr std::int32_t kOperationFlipVertical = 49;
inline constexpr std::int32_t kOperationNegative = 68;
inline constexpr std::int32_t kOperationResample = 82;
inline constexpr std::int32_t kOperationRotate = 84;
inline constexpr std::int32_t kOperationText = 93;
// Beyond the numbers that listeners know from elsewhere.
inline constexpr std::int32_t kOperationConvertPixels = 256;
inline constexpr std::int32_t kOperationConvertToPalette = 257;

/// Caption of an operation for the user, as undo states show it; empty for unknown numbers.
std::u16string OperationCaption(std::int32_t operation);

}  // namespace zm
