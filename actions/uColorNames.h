#pragma once

#include <string>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// The platform's name of a colour value: an identifier such as "clRed" or "clBtnFace", or "$"
/// and eight hexadecimal digits in upper case.
std::u16string ColorToText(TColor color);

/// The name as descriptions show it: an identifier without "cl" in lower case, a colour without
/// system bits as "#" and its six digits (blue first, as the value has them), any other as is.
std::u16string ColorDescription(TColor color);

}  // namespace zm
