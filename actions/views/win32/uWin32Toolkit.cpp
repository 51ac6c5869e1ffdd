#include "actions/views/uFormToolkit.h"

namespace zm {

TFormToolkitProvider FormToolkitProvider() {
    return nullptr;
}

}  // namespace zm
