#include "actions/uActionFormParts_p.h"

#include <utility>

namespace zm {
namespace {

constexpr std::int32_t kUnitWidth = 110;
constexpr std::int32_t kPositionWidth = 180;
constexpr std::int32_t kCustomWidth = 130;
constexpr std::int32_t kCustomLeft = kFormMargin + kPositionWidth + kFormMargin;
constexpr std::int32_t kPositionCustom = 3;

TFormControl NewControl(TFormControlKind kind, const char16_t* name, const char16_t* caption,
                        const TRect& bounds) {
    TFormControl control;
    control.kind = kind;
    control.name = name;
    control.caption = caption;
    control.bounds = bounds;
    return control;
}

/// Gives the controls from `first` on other anchors.
void AnchorFrom(TActionFormDesign& form, std::size_t first, std::uint8_t anchors) {
    for (std::size_t index = first; index < form.controls.size(); ++index) {
        form.controls[index].anchors = anchors;
    }
}

std::vector<TFormControl> SideControls(const TActionFormDesign& form, std::int32_t top,
                                       const std::u16string& side, const char16_t* caption) {
    const std::u16string edit = u"edt" + side;
    const std::int32_t width = FullRow(form).width - kUnitWidth - kFormMargin;
    return {Label((u"lbl" + side).c_str(), caption, LabelPlace(top, {kFormMargin, width}),
                  edit.c_str()),
            Edit(edit.c_str(), u"", u"0", FieldPlace(top, {kFormMargin, width}))};
}

}  // namespace

TRowSpan FullRow(const TActionFormDesign& form) {
    return {kFormMargin, form.client_width - 2 * kFormMargin};
}

TRect LabelPlace(std::int32_t top, TRowSpan span) {
    return {span.left, top, span.left + span.width, top + kLabelHeight};
}

TRect FieldPlace(std::int32_t top, TRowSpan span) {
    return {span.left, top + kFieldTop, span.left + span.width, top + kLabelledHeight};
}

TRect SuffixPlace(std::int32_t top, std::int32_t left) {
    const std::int32_t label_top = top + kFieldTop + (kFieldHeight - kLabelHeight) / 2;
    return {left, label_top, left + kSuffixWidth, label_top + kLabelHeight};
}

TActionFormDesign NewFormDesign(const char16_t* class_name, const char16_t* caption,
                                std::int32_t client_width, std::int32_t client_height,
                                std::int32_t help_context) {
    TActionFormDesign form;
    form.class_name = class_name;
    form.caption = caption;
    form.client_width = client_width;
    form.client_height = client_height;
    form.help_context = help_context;
    return form;
}

TFormControl Label(const char16_t* name, const char16_t* caption, const TRect& bounds,
                   const char16_t* focus_control) {
    TFormControl label = NewControl(fcLabel, name, caption, bounds);
    label.focus_control = focus_control;
    return label;
}

TFormControl WrappedLabel(const char16_t* name, const char16_t* caption, const TRect& bounds) {
    return NewControl(fcWrappedLabel, name, caption, bounds);
}

TFormControl Edit(const char16_t* name, const char16_t* key, const char16_t* default_text,
                  const TRect& bounds) {
    TFormControl edit = NewControl(fcEdit, name, u"", bounds);
    edit.key = key;
    edit.default_text = default_text;
    edit.takes_variable = true;
    return edit;
}

TFormControl ComboBox(const char16_t* name, const char16_t* key, std::vector<std::u16string> items,
                      const TRect& bounds) {
    TFormControl list = NewControl(fcComboBox, name, u"", bounds);
    list.key = key;
    list.items = std::move(items);
    return list;
}

TFormControl RadioGroup(const TActionFormDesign& form, const char16_t* name,
                        const char16_t* caption, const char16_t* key,
                        std::vector<std::u16string> items) {
    const TRowSpan row = FullRow(form);
    TFormControl group =
        NewControl(fcRadioGroup, name, caption,
                   {row.left, kFirstRow, row.left + row.width, kFirstRow + kGroupHeight});
    group.key = key;
    group.columns = static_cast<std::int32_t>(items.size());
    group.items = std::move(items);
    return group;
}

TFormControl CheckBox(const char16_t* name, const char16_t* caption, const char16_t* key,
                      const TRect& bounds) {
    TFormControl box = NewControl(fcCheckBox, name, caption, bounds);
    box.key = key;
    return box;
}

TFormControl Button(const char16_t* name, const char16_t* caption, TFormButton button,
                    const char16_t* target, const TRect& bounds) {
    TFormControl control = NewControl(fcButton, name, caption, bounds);
    control.button = button;
    control.target = target;
    return control;
}

void Append(TActionFormDesign& form, std::vector<TFormControl> controls) {
    for (TFormControl& control : controls) {
        form.controls.push_back(std::move(control));
    }
}

void AddFileField(TActionFormDesign& form, std::int32_t top, TFormButton picker) {
    const std::int32_t button_left = form.client_width - kFormMargin - kSmallButtonWidth;
    const TRowSpan edit{kFormMargin, button_left - kFormGap - kFormMargin};
    Append(form, {Label(u"lblImageFile", u"Image File:", LabelPlace(top, edit), u"edtImageFile"),
                  Edit(u"edtImageFile", u"image_file", u"", FieldPlace(top, edit)),
                  Button(u"btnSelectFile", u"...", picker, u"edtImageFile",
                         FieldPlace(top, {button_left, kSmallButtonWidth}))});
}

void AddSideFields(TActionFormDesign& form, std::int32_t top) {
    struct TSide {
        const char16_t* name;
        const char16_t* caption;
        const char16_t* key;
        const char16_t* unit_key;
    };
    constexpr TSide kSides[] = {{u"L", u"Left:", u"l", u"ul"},
                                {u"T", u"Top:", u"t", u"ut"},
                                {u"R", u"Right:", u"r", u"ur"},
                                {u"B", u"Bottom:", u"b", u"ub"}};
    // All lengths are stored before all units.
    std::int32_t row = top;
    for (const TSide& side : kSides) {
        Append(form, SideControls(form, row, side.name, side.caption));
        form.controls.back().key = side.key;
        row += kLabelledPitch;
    }
    row = top;
    const TRowSpan unit{form.client_width - kFormMargin - kUnitWidth, kUnitWidth};
    for (const TSide& side : kSides) {
        const std::u16string name = std::u16string(u"cbUnits") + side.name;
        Append(form, {ComboBox(name.c_str(), side.unit_key, UnitItems(), FieldPlace(row, unit))});
        row += kLabelledPitch;
    }
}

void AddPositionFields(TActionFormDesign& form, std::int32_t top, std::uint8_t anchors) {
    const std::size_t first = form.controls.size();
    const std::int32_t below = top + kLabelledPitch;
    const TRowSpan list{kFormMargin, kPositionWidth};
    const TRowSpan custom{kCustomLeft, kCustomWidth};
    const std::int32_t suffix_left = kCustomLeft + kCustomWidth + kFormGap;
    Append(form, {Label(u"lblXPos", u"Horizontal position:", LabelPlace(top, list), u"cbXPos"),
                  ComboBox(u"cbXPos", u"x_pos", {u"Left", u"Center", u"Right", u"Custom"},
                           FieldPlace(top, list)),
                  Label(u"lblYPos", u"Vertical position:", LabelPlace(below, list), u"cbYPos"),
                  ComboBox(u"cbYPos", u"y_pos", {u"Top", u"Center", u"Bottom", u"Custom"},
                           FieldPlace(below, list)),
                  Edit(u"edtCustomX", u"custom_x", u"0", FieldPlace(top, custom)),
                  Label(u"lblCustomX", u"px", SuffixPlace(top, suffix_left), u"edtCustomX"),
                  Edit(u"edtCustomY", u"custom_y", u"0", FieldPlace(below, custom)),
                  Label(u"lblCustomY", u"px", SuffixPlace(below, suffix_left), u"edtCustomY")});
    AnchorFrom(form, first, anchors);
    for (std::size_t index = first; index < form.controls.size(); ++index) {
        if (form.controls[index].kind == fcComboBox) {
            form.controls[index].default_value = kPositionCustom;
        }
    }
}

void AddFormButtons(TActionFormDesign& form) {
    const std::int32_t top = form.client_height - kFormMargin - kButtonHeight;
    const std::int32_t cancel_left = form.client_width - kFormMargin - kButtonWidth;
    const std::int32_t ok_left = cancel_left - kFormGap - kButtonWidth;
    const auto place = [top](std::int32_t left, std::int32_t width) {
        return TRect{left, top, left + width, top + kButtonHeight};
    };
    const std::size_t first = form.controls.size();
    Append(form,
           {Button(u"SpeedButton1", u"{V}", fbVariable, u"", place(kFormMargin, kSmallButtonWidth)),
            Button(u"btnOk", u"&OK", fbOk, u"", place(ok_left, kButtonWidth)),
            Button(u"btnCancel", u"&Cancel", fbCancel, u"", place(cancel_left, kButtonWidth))});
    AnchorFrom(form, first, faRight | faBottom);
    TFormControl& variable = form.controls[first];
    variable.kind = fcSpeedButton;
    variable.hint = u"Insert variable";
    variable.anchors = faLeft | faBottom;
}

void EnableCustomPositions(TActionForm& form) {
    form.EnableControls(u"lblCustomX", form.State(u"cbXPos").index == kPositionCustom);
    form.EnableControls(u"lblCustomY", form.State(u"cbYPos").index == kPositionCustom);
}

bool HasImageFile(const TActionForm& form) {
    return !form.State(u"edtImageFile").text.empty();
}

std::vector<std::u16string> UnitItems() {
    return {u"Pixels", u"Percent"};
}

}  // namespace zm
