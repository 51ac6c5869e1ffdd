#pragma once

#include <cstddef>
#include <cstdint>

/// Icon handles for records that other programs read.
namespace zm::platform {

/// Makes an icon from the image of one entry of an icon file: info header with the doubled
/// height, palette, colour rows and mask rows, bottom row first. The bytes are copied. Nil where
/// the system has no icon handles or refuses the image. Any thread.
void* CreateIconHandle(const std::uint8_t* image, std::size_t size_bytes, std::int32_t width,
                       std::int32_t height);

/// Frees a handle of CreateIconHandle; nil does nothing.
void DestroyIconHandle(void* icon);

}  // namespace zm::platform
