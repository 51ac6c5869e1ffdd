#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "engine/foundation/zmdefs.h"

namespace zm {

/// The platform's name of a colour value: an identifier such as "clRed" or "clBtnFace", or "$"
/// and eight hexadecimal digits in upper case.
std::u16string ColorToText(TColor color);

/// The name as descriptions show it: an identifier without "cl" in lower case, a colour without
/// system bits as "#" and its six digits (blue first, as the value has them), any other as is.
std::u16string ColorDescription(TColor color);

/// Items of a colour box by their pretty names: "Custom..." for any other colour, then the
/// sixteen standard and the four extended colours.
std::vector<std::u16string> ColorBoxItems();
/// Item of a colour; 0 for one that the box doesn't name.
std::int32_t ColorBoxIndex(TColor color);
/// Colour of an item from 1; black for other indexes.
TColor ColorBoxColor(std::int32_t index);

}  // namespace zm
