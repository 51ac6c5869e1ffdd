#pragma once

#include <cstdint>
#include <vector>

#include "actions/uActionForms.h"

/// Geometry and order of a form's controls: what every view computes alike. Pure functions, so
/// that a view in a module of its own can bring them along.
namespace zm {

/// A length of the design at a scale in percent, rounded half up.
std::int32_t ScaleLength(std::int32_t length, std::int32_t scale_percent);

/// Place of a control in a client area of the given size; all in scaled pixels. In an area of
/// the design's own (scaled) size it is the scaled bounds; a smaller area never gives a
/// rectangle of negative size.
TRect PlaceControl(const TActionFormDesign& design, const TFormControl& control,
                   std::int32_t scale_percent, std::int32_t client_width,
                   std::int32_t client_height);

/// Places of a radio group's items, in scaled pixels from the top left of the group. Items fill
/// rows from the left; columns are as wide as their longest items ask for.
std::vector<TRect> RadioItemPlaces(const TFormControl& group, std::int32_t scale_percent);

/// Indexes of all controls in the order of the focus: row by row, from the left; a label comes
/// directly before the control that it names.
std::vector<std::int32_t> TabOrder(const TActionFormDesign& design);

/// A caption without its mnemonic marks.
std::u16string PlainCaption(std::u16string_view caption);

/// The nearest font that can be shown: at most 31 characters of the name, 1 to 400 points, the
/// four known styles.
TFormFont FontToShow(const TFormFont& font);

}  // namespace zm
