#include "engine/platform/imagescaler.h"

namespace zm::platform {

/// No imaging component belongs to this system.
bool ScaleImage(const TScalerRequest& /*request*/) {
    return false;
}

}  // namespace zm::platform
