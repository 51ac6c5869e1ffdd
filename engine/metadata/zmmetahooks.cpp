#include "engine/metadata/zmmetahooks.h"

namespace zm {

TZmMetadataHooks& MetadataHooks() {
    static TZmMetadataHooks hooks;
    return hooks;
}

}  // namespace zm
