#include "actions/uActionFormParts_p.h"

namespace zm {
namespace {

constexpr std::int32_t kPositionRow = kFirstRow + kLabelledPitch;
constexpr std::int32_t kOpacityRow = kPositionRow + 2 * kLabelledPitch;
constexpr TRowSpan kOpacityField{kFormMargin, 180};

TActionFormDesign Declare() {
    TActionFormDesign form =
        NewFormDesign(u"TfrmImageOnImageAction", u"Draw Image", 451, 332, 4310);
    form.apply_rules = &EnableCustomPositions;
    form.check = &HasImageFile;
    AddFileField(form, kFirstRow, fbOpenFile);
    AddPositionFields(form, kPositionRow, faLeft | faTop);
    Append(form,
           {Label(u"lblOpacity", u"Opacity (0-100):", LabelPlace(kOpacityRow, kOpacityField),
                  u"edtOpacity"),
            Edit(u"edtOpacity", u"opacity", u"100", FieldPlace(kOpacityRow, kOpacityField)),
            Label(u"lblPercent", u"%",
                  SuffixPlace(kOpacityRow, kOpacityField.left + kOpacityField.width + kFormGap),
                  u"edtOpacity")});
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& ImageOnImageForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
