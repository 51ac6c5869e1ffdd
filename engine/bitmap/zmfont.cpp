#include "engine/bitmap/zmfont.h"

#include "engine/foundation/zmnumbers.h"
#include "engine/foundation/zmsettings.h"

namespace zm {
namespace {

constexpr double kPointsPerInch = 72;

/// Dots per inch of the screen; without one, those of a plain screen.
double ScreenDpi() {
    constexpr std::int32_t kPlainDpi = 96;
    const std::int32_t dpi = ZmGlobalSettings().fSystemDPIY;
    return dpi > 0 ? dpi : kPlainDpi;
}

}  // namespace

std::int32_t TFont::GetSize() const {
    return RoundHalfEven(-static_cast<double>(Height) * kPointsPerInch / ScreenDpi());
}

void TFont::SetSize(std::int32_t points) {
    Height = RoundHalfEven(-static_cast<double>(points) * ScreenDpi() / kPointsPerInch);
}

}  // namespace zm
