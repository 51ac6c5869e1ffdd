#include "actions/uActionFormParts_p.h"

namespace zm {
namespace {

constexpr std::int32_t kHintRow = kFirstRow + 4 * kLabelledPitch;

TActionFormDesign Declare() {
    TActionFormDesign form = NewFormDesign(u"TfrmCropImageAction", u"Crop Image", 361, 376, 4280);
    const TRowSpan row = FullRow(form);
    AddSideFields(form, kFirstRow);
    Append(form,
           {WrappedLabel(u"lblHint",
                         u"HINT: Negative values meaning that they will be deducted from "
                         u"actual image width/height.",
                         {row.left, kHintRow, row.left + row.width, kHintRow + kHintHeight})});
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& CropImageForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
