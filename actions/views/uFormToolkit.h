#pragma once

#include "actions/uActionForms.h"

namespace zm {

/// The way to the toolkit of the system that the plug-in was built for, defined by the view of
/// that system. The plug-in's entry installs it; tests and programs without dialogs don't.
TFormToolkitProvider FormToolkitProvider();

}  // namespace zm
