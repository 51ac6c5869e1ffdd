#pragma once

#include <string>
#include <vector>

#include "host/qvvariables.h"

namespace zm::qvrun {

/// Lets the user pick a variable, modal to the window that the user is in. Its reference, or
/// empty.
std::u16string RunVariableDialog(const std::vector<TVariableInfo>& variables);

}  // namespace zm::qvrun
