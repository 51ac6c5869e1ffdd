#pragma once

#include <string>

#include "actions/uActionForms.h"

/// The boundary between the plug-in and the module that brings GTK. Both are built together by
/// one compiler; the module has a single exported name, and everything else goes through virtual
/// functions.
namespace zm {

/// File name of the module; it lies beside the plug-in.
inline constexpr char16_t kGtkModuleName[] = u"Graphics-gtk.so";
inline constexpr char kGtkFormToolkitName[] = "ZmGtkFormToolkit";

/// The module's toolkit, connected to the display; nil with a sentence in `reason` when there is
/// no display. The thread that first calls it is the one that shows all forms.
using TGtkFormToolkit = IActionFormToolkit* (*)(std::u16string& reason);

}  // namespace zm
