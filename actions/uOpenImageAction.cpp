#include "actions/uActionFormParts_p.h"

namespace zm {
namespace {

constexpr std::int32_t kSourceFile = 0;

bool ReadsFile(const TActionForm& form) {
    return form.State(u"rgSource").index == kSourceFile;
}

void ApplyRules(TActionForm& form) {
    form.EnableControls(u"edtImageFile", ReadsFile(form));
    form.EnableControls(u"btnSelectFile", ReadsFile(form));
}

bool Check(const TActionForm& form) {
    return !ReadsFile(form) || HasImageFile(form);
}

TActionFormDesign Declare() {
    TActionFormDesign form = NewFormDesign(u"TfrmOpenImageAction", u"Open Image", 361, 224, 4250);
    form.apply_rules = &ApplyRules;
    form.check = &Check;
    Append(form, {RadioGroup(form, u"rgSource", u"Source", u"source", {u"File", u"Clipboard"})});
    AddFileField(form, kRowBelowGroup, fbOpenFile);
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& OpenImageForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
