#include "actions/uActionFormParts_p.h"
#include "actions/uImageList.h"
#include "engine/foundation/zmstrings.h"
#include "engine/io/zmfileformats.h"

namespace zm {
namespace {

constexpr std::int32_t kDestFile = 0;
constexpr std::int32_t kFormatRow = kRowBelowGroup + kLabelledPitch;
constexpr std::int32_t kMetaRow = kFormatRow + kLabelledPitch;

bool WritesFile(const TActionForm& form) {
    return form.State(u"rgDest").index == kDestFile;
}

// Each label brings its field along.
void ApplyRules(TActionForm& form) {
    form.EnableControls(u"lblImageFile", WritesFile(form));
    form.EnableControls(u"btnSelectFile", WritesFile(form));
    form.EnableControls(u"lblImageFormat", WritesFile(form));
}

bool Check(const TActionForm& form) {
    return !WritesFile(form) || HasImageFile(form);
}

std::vector<std::u16string> FormatItems() {
    std::vector<std::u16string> items;
    for (std::int32_t index = 0; const TSaveFormat* format = SaveFormatAt(index); ++index) {
        items.push_back(Utf16FromUtf8(FileTypeName(format->file_type)));
    }
    return items;
}

TActionFormDesign Declare() {
    TActionFormDesign form = NewFormDesign(u"TfrmSaveImageAction", u"Save Image", 361, 316, 4260);
    form.apply_rules = &ApplyRules;
    form.check = &Check;
    const TRowSpan row = FullRow(form);
    Append(form, {RadioGroup(form, u"rgDest", u"Destination", u"dest", {u"File", u"Clipboard"})});
    AddFileField(form, kRowBelowGroup, fbSaveFile);
    Append(
        form,
        {Label(u"lblImageFormat", u"Image Format:", LabelPlace(kFormatRow, row), u"cbImageFormat"),
         ComboBox(u"cbImageFormat", u"format", FormatItems(), FieldPlace(kFormatRow, row)),
         CheckBox(u"cbSaveMeta", u"Save metadata if available (EXIF, IPTC, etc)", u"save_meta",
                  {row.left, kMetaRow, row.left + row.width, kMetaRow + kFieldHeight})});
    AddFormButtons(form);
    return form;
}

}  // namespace

const TActionFormDesign& SaveImageForm() {
    static const TActionFormDesign form = Declare();
    return form;
}

}  // namespace zm
