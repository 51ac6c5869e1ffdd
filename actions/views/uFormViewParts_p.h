#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>

#include "actions/uActionForms.h"

/// What the views of all toolkits have in common.
namespace zm {

// What a plain frame adds to a client area in the design: sizes of whole windows include it, and
// frames on screen differ and do not scale with the form.
inline constexpr std::int32_t kDesignFrameWidth = 16;
inline constexpr std::int32_t kDesignFrameHeight = 39;

/// More characters than any sample panel shows; drawing the whole of a long text would take long.
inline constexpr std::size_t kMaxSampleLength = 500;

inline constexpr std::uint8_t kAllFormChanges =
    fchText | fchIndex | fchChecked | fchEnabled | fchColor | fchFont;

/// While it lives the view itself changes its controls: what they tell is then no user's act.
class TSyncGuard {
public:
    explicit TSyncGuard(int& depth) : depth_(depth) { ++depth_; }
    ~TSyncGuard() { --depth_; }
    TSyncGuard(const TSyncGuard&) = delete;
    TSyncGuard& operator=(const TSyncGuard&) = delete;

private:
    int& depth_;
};

/// The options within the scales that forms are made for.
inline TFormShowOptions BoundedOptions(TFormShowOptions options) {
    options.scale_percent = std::clamp(options.scale_percent, 100, 250);
    return options;
}

/// Presses the form's button of this kind, for keys and the close box.
inline void PressFormButton(IActionForm& form, TFormButton button) {
    std::int32_t index = 0;
    for (const TFormControl& control : form.Design().controls) {
        if (control.button == button) {
            form.PressButton(index);
            return;
        }
        ++index;
    }
}

}  // namespace zm
