#include "actions/uActionFormParts_p.h"
#include "actions/uColorNames.h"

namespace zm {
namespace {

constexpr std::int32_t kColorRow = kFirstRow + 4 * kLabelledPitch;

TFormControl ColorBox(const TRect& bounds) {
    TFormControl box;
    box.kind = fcColorBox;
    box.name = u"cbColor";
    box.key = u"color";
    box.bounds = bounds;
    box.items = ColorBoxItems();
    return box;
}

TActionFormDesign Declare() {
    TActionFormDesign form =
        NewFormDesign(u"TfrmAddBorderAction", u"Add Border to Image", 361, 385, 4320);
    const TRowSpan row = FullRow(form);
    AddSideFields(form, kFirstRow);
    Append(form, {Label(u"lblColor", u"Color:", LabelPlace(kColorRow, row), u"cbColor"),
                  ColorBox(FieldPlace(kColorRow, row))});
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& AddBorderForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
