#pragma once

#include <windows.h>

#include <cstdint>

#include "actions/uActionForms.h"

namespace zm {

inline constexpr int kFirstControlId = 100;
inline constexpr int kFirstRadioItemId = 1000;
inline constexpr int kMaxRadioItems = 32;  ///< of one group

/// Identifier of the window that stands for a control; of a radio group's it is the frame.
inline int ControlWindowId(const TFormControl& control, std::int32_t index) {
    switch (control.button) {
        case fbOk: return IDOK;
        case fbCancel: return IDCANCEL;
        default: return kFirstControlId + index;
    }
}

inline int RadioItemId(std::int32_t group_index, std::int32_t item) {
    return kFirstRadioItemId + group_index * kMaxRadioItems + item;
}

}  // namespace zm
