#include "engine/platform/resources.h"

#include "engine/foundation/zmutils_peresources_p.h"

namespace zm::platform {

std::unique_ptr<TResourceModule> OpenResourceModule(const std::u16string& file_name) {
    return OpenPeFile(file_name);
}

}  // namespace zm::platform
