#pragma once

#include "plugin/AFPlugin.h"

/// Inner parts of the component: the process-wide reference and the functions that the records
/// carry.
namespace zm {

/// The component that was initialised last and still lives; nil without one.
TAFPlugin* PluginInstance();

/// Sets the function fields of the records.
void SetActionThunks(TAFActionsInfo& info);
void SetEventThunks(TAFEventsInfo& info);
/// Fields without a handler become nil.
void SetPluginThunks(const TAFPlugin& plugin, TAFPluginInfo& info);

/// Test programs only: forgets that a component was initialised, so that one process can try
/// several, one after the other. No component may be alive.
void AllowAnotherInitializeForTests();

}  // namespace zm
