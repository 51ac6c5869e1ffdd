#include <functional>

#include "actions/views/uFormToolkit.h"
#include "engine/platform/callconv.h"
#include "engine/platform/hostboundary.h"
#include "plugin/uGraphicsDM.h"

/// The module's entry, the one name that a host looks up.
ZM_EXPORT zm::TAFPluginInfo* ZM_STDCALL InitQVPlugin(zm::TAFAppInfo* app_info) {
    zm::TAFPluginInfo* plugin_info = nullptr;
    auto body = [&] {
        zm::InstallFormToolkit(zm::FormToolkitProvider());
        plugin_info = zm::StartPlugin(app_info);
    };
    zm::platform::GuardHostCall(std::ref(body));
    return plugin_info;
}
