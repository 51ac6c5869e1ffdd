#pragma once

#include <cstdint>
#include <optional>

/// Version of the system and traits of its screen, for the settings' defaults.
namespace zm::platform {

struct TSystemVersion {
    std::uint32_t platform_id = 0;  ///< 1 the old line, 2 the NT line
    std::uint32_t major = 0;
    std::uint32_t minor = 0;
};

/// Version as the system reports it to this process; nothing on systems without that scheme.
std::optional<TSystemVersion> SystemVersion();

/// Where there is no screen the values are those of a plain one: 32 bits, 96 dots per inch.
struct TScreenTraits {
    std::int32_t bits_per_pixel = 32;
    std::int32_t dpi_x = 96;
    std::int32_t dpi_y = 96;
    std::int32_t edge_x = 2;  ///< raised window edge, pixels
    std::int32_t edge_y = 2;
    std::int32_t border_x = 1;  ///< window border, pixels
    std::int32_t border_y = 1;
    std::int32_t vertical_scroll_width = 17;
    std::int32_t horizontal_scroll_height = 17;
    bool is_remote_session = false;
};
TScreenTraits ScreenTraits();

/// A colour of the system's scheme by its number, red in the low byte; black for other numbers.
/// Where there is no scheme the values are those that Windows begins with.
std::uint32_t SystemColor(std::uint8_t number);

/// Whether the processor has the MMX instructions.
bool ProcessorHasMMX();

}  // namespace zm::platform
