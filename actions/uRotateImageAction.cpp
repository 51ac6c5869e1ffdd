#include "actions/uActionFormParts_p.h"

namespace zm {
namespace {

constexpr std::int32_t kActionRotate = 0;
constexpr std::int32_t kHintRow = kRowBelowGroup + kLabelledPitch;

void ApplyRules(TActionForm& form) {
    const bool rotates = form.State(u"rgAction").index == kActionRotate;
    form.EnableControls(u"lblAngle", rotates);
    form.EnableControls(u"lblHint", rotates);
}

TActionFormDesign Declare() {
    TActionFormDesign form =
        NewFormDesign(u"TfrmRotateImageAction", u"Rotate Image", 361, 257, 4290);
    form.apply_rules = &ApplyRules;
    const TRowSpan row = FullRow(form);
    Append(form,
           {RadioGroup(form, u"rgAction", u"Action", u"action",
                       {u"Rotate", u"Flip Horizontal", u"Flip Vertical"}),
            Label(u"lblAngle", u"Angle (degrees):", LabelPlace(kRowBelowGroup, row), u"edtAngle"),
            Edit(u"edtAngle", u"angle", u"90", FieldPlace(kRowBelowGroup, row)),
            WrappedLabel(u"lblHint",
                         u"HINT: positive value for clockwise rotation, negative value "
                         u"for counter-clockwise",
                         {row.left, kHintRow, row.left + row.width, kHintRow + kHintHeight})});
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& RotateImageForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
