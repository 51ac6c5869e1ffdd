#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "actions/uActionFormModel.h"

/// What the forms are declared with: the grid that all of them stand on, controls with their
/// usual properties, and the fields and rules that several forms share.
namespace zm {

// The grid, in pixels at 96 dpi. Fields are a little higher and wider than the design's font
// asks for, so that systems with larger fonts clip nothing.
inline constexpr std::int32_t kFormMargin = 12;  ///< to the sides, and between rows
inline constexpr std::int32_t kFormGap = 8;      ///< between controls of a row
inline constexpr std::int32_t kFieldHeight = 26;
inline constexpr std::int32_t kButtonWidth = 80;
inline constexpr std::int32_t kButtonHeight = 28;
inline constexpr std::int32_t kSmallButtonWidth = 40;  ///< of "..." and "{V}"
inline constexpr std::int32_t kSuffixWidth = 28;       ///< of "px" and "%"
inline constexpr std::int32_t kLabelHeight = 17;
inline constexpr std::int32_t kFieldTop = kLabelHeight + 2;  ///< of a field below its label
inline constexpr std::int32_t kLabelledHeight = kFieldTop + kFieldHeight;
inline constexpr std::int32_t kLabelledPitch = kLabelledHeight + kFormMargin;
inline constexpr std::int32_t kGroupHeight = 54;  ///< of a radio group with one row of items
inline constexpr std::int32_t kHintHeight = 3 * kLabelHeight;
/// First row, and the row below a radio group that is the first.
inline constexpr std::int32_t kFirstRow = kFormMargin;
inline constexpr std::int32_t kRowBelowGroup = kFirstRow + kGroupHeight + kFormMargin;

/// Part of a row: from `left`, `width` wide.
struct TRowSpan {
    std::int32_t left;
    std::int32_t width;
};

/// The whole row of a form.
TRowSpan FullRow(const TActionFormDesign& form);

// Places in a row that begins at `top`.
TRect LabelPlace(std::int32_t top, TRowSpan span);
/// Field below its label.
TRect FieldPlace(std::int32_t top, TRowSpan span);
/// Label beside a field that stands below a label.
TRect SuffixPlace(std::int32_t top, std::int32_t left);

TActionFormDesign NewFormDesign(const char16_t* class_name, const char16_t* caption,
                                std::int32_t client_width, std::int32_t client_height,
                                std::int32_t help_context);

// Controls with their usual properties.
TFormControl Label(const char16_t* name, const char16_t* caption, const TRect& bounds,
                   const char16_t* focus_control = u"");
TFormControl WrappedLabel(const char16_t* name, const char16_t* caption, const TRect& bounds);
TFormControl Edit(const char16_t* name, const char16_t* key, const char16_t* default_text,
                  const TRect& bounds);
TFormControl ComboBox(const char16_t* name, const char16_t* key, std::vector<std::u16string> items,
                      const TRect& bounds);
/// A group at the top of a form.
TFormControl RadioGroup(const TActionFormDesign& form, const char16_t* name,
                        const char16_t* caption, const char16_t* key,
                        std::vector<std::u16string> items);
TFormControl CheckBox(const char16_t* name, const char16_t* caption, const char16_t* key,
                      const TRect& bounds);
TFormControl Button(const char16_t* name, const char16_t* caption, TFormButton button,
                    const char16_t* target, const TRect& bounds);

// Shared fields. Each appends its controls, in the order in which their keys are stored.
void Append(TActionFormDesign& form, std::vector<TFormControl> controls);
/// `edtImageFile` with its label and `btnSelectFile`.
void AddFileField(TActionFormDesign& form, std::int32_t top, TFormButton picker);
/// The four sides, each with its unit, in rows from `top`.
void AddSideFields(TActionFormDesign& form, std::int32_t top);
/// `cbXPos` and `cbYPos` with the edits of their custom positions, in two rows from `top`.
void AddPositionFields(TActionFormDesign& form, std::int32_t top, std::uint8_t anchors);
/// "{V}", OK and Cancel at the bottom; the last of a form.
void AddFormButtons(TActionFormDesign& form);

// Shared rules.
/// The custom positions are open to "Custom" only.
void EnableCustomPositions(TActionForm& form);
/// The edit `edtImageFile` isn't empty.
bool HasImageFile(const TActionForm& form);

/// Units of a length, by their index in the settings.
std::vector<std::u16string> UnitItems();

}  // namespace zm
