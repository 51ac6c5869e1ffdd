#include "actions/uActionFormParts_p.h"

namespace zm {
namespace {

constexpr std::int32_t kMethodSides = 1;
constexpr std::int32_t kUnitPercent = 1;
constexpr std::int32_t kUnitListWidth = 110;
constexpr std::int32_t kHeightRow = kRowBelowGroup + kLabelledPitch;
constexpr std::int32_t kKeepRow = kHeightRow + kLabelledPitch;

bool KeepsAspectRatio(const TActionForm& form) {
    return form.State(u"cbKeepAspectRatio").checked;
}

void ApplyRules(TActionForm& form) {
    const bool sides = form.State(u"rgCalcMethod").index == kMethodSides;
    // With a fixed ratio the numbers are bounds that the image is fitted into.
    const std::u16string prefix = KeepsAspectRatio(form) ? u"Max " : u"";
    form.PutText(u"lblWidth", prefix + (sides ? u"&Long Side:" : u"&Width:"));
    form.PutText(u"lblHeight", prefix + (sides ? u"&Short Side:" : u"&Height:"));
}

/// Percentages of a fixed ratio are the same for both sides.
void LinkSides(TActionForm& form, std::int32_t changed_control) {
    const bool linked = KeepsAspectRatio(form) && form.State(u"cbUnitsW").index == kUnitPercent &&
                        form.State(u"cbUnitsH").index == kUnitPercent;
    if (!linked) {
        return;
    }
    const std::u16string& text = form.State(changed_control).text;
    form.PutText(changed_control == form.IndexOf(u"edtImageW") ? u"edtImageH" : u"edtImageW", text);
}

TActionFormDesign Declare() {
    TActionFormDesign form =
        NewFormDesign(u"TfrmResizeImageAction", u"Resize Image", 361, 339, 4270);
    form.apply_rules = &ApplyRules;
    form.link = &LinkSides;
    const TRowSpan row = FullRow(form);
    const TRowSpan edit{row.left, row.width - kUnitListWidth - kFormMargin};
    const TRowSpan unit{row.left + row.width - kUnitListWidth, kUnitListWidth};
    Append(form, {RadioGroup(form, u"rgCalcMethod", u"Calculate Method", u"calc_method",
                             {u"Width && Height", u"Long Side && Short Side"}),
                  Label(u"lblWidth", u"&Width:", LabelPlace(kRowBelowGroup, edit), u"edtImageW"),
                  Edit(u"edtImageW", u"image_w", u"300", FieldPlace(kRowBelowGroup, edit)),
                  Label(u"lblHeight", u"&Height:", LabelPlace(kHeightRow, edit), u"edtImageH"),
                  Edit(u"edtImageH", u"image_h", u"300", FieldPlace(kHeightRow, edit)),
                  ComboBox(u"cbUnitsW", u"units_w", UnitItems(), FieldPlace(kRowBelowGroup, unit)),
                  ComboBox(u"cbUnitsH", u"units_h", UnitItems(), FieldPlace(kHeightRow, unit)),
                  CheckBox(u"cbKeepAspectRatio", u"Keep Aspect Ratio", u"keep_aspect_ratio",
                           {row.left, kKeepRow, row.left + row.width, kKeepRow + kFieldHeight})});
    form.controls.back().default_value = 1;
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& ResizeImageForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
