#include "actions/uActionFormParts_p.h"

namespace zm {
namespace {

constexpr std::int32_t kSampleRow = kFirstRow + kLabelledPitch;
constexpr std::int32_t kSampleTop = kSampleRow + kFieldTop;
constexpr TRowSpan kLabelSpan{kFormMargin, 180};
constexpr std::int32_t kSampleHeight = 132;
constexpr std::int32_t kPositionRow = kSampleTop + kSampleHeight + kFormMargin;

void ApplyRules(TActionForm& form) {
    EnableCustomPositions(form);
    form.PutText(u"panSample", form.State(u"edtText").text);
}

bool HasText(const TActionForm& form) {
    return !form.State(u"edtText").text.empty();
}

TFormControl Anchored(TFormControl control, int anchors) {
    control.anchors = static_cast<std::uint8_t>(anchors);
    return control;
}

/// The sample takes the room that a larger window gives.
TFormControl SamplePanel(std::int32_t right) {
    TFormControl panel;
    panel.kind = fcSamplePanel;
    panel.name = u"panSample";
    panel.key = u"font";
    panel.bounds = {kFormMargin, kSampleTop, right, kSampleTop + kSampleHeight};
    panel.anchors = faLeft | faTop | faRight | faBottom;
    return panel;
}

TActionFormDesign Declare() {
    TActionFormDesign form =
        NewFormDesign(u"TfrmTextOnImageAction", u"Draw Text on Image", 562, 399, 4300);
    form.border = fbsSizeable;
    form.min_window_width = 404;
    form.min_window_height = 438;
    form.apply_rules = &ApplyRules;
    form.check = &HasText;
    const TRowSpan row = FullRow(form);
    const std::int32_t font_left = row.left + row.width - kButtonWidth;
    Append(form, {Label(u"lblText", u"Text:", LabelPlace(kFirstRow, kLabelSpan), u"edtText"),
                  Anchored(Edit(u"edtText", u"text", u"", FieldPlace(kFirstRow, row)),
                           faLeft | faTop | faRight),
                  Label(u"lblSample", u"Sample:", LabelPlace(kSampleRow, kLabelSpan)),
                  Anchored(Button(u"btnSelectFont", u"Font...", fbFont, u"panSample",
                                  {font_left, kSampleTop, font_left + kButtonWidth,
                                   kSampleTop + kButtonHeight}),
                           faTop | faRight),
                  SamplePanel(font_left - kFormGap)});
    AddPositionFields(form, kPositionRow, faLeft | faBottom);
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& TextOnImageForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
