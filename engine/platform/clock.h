#pragma once

#include <cstdint>

namespace zm::platform {

/// A moment of the calendar and the clock on the wall.
struct TLocalTime {
    std::int32_t year = 1970;
    std::int32_t month = 1;  ///< 1 to 12
    std::int32_t day = 1;    ///< 1 to 31
    std::int32_t hour = 0;
    std::int32_t minute = 0;
    std::int32_t second = 0;
};

/// The present moment in the user's time zone. Any thread may ask.
TLocalTime LocalNow();

}  // namespace zm::platform
