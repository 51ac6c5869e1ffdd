#pragma once

#include <cstdint>
#include <functional>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "actions/uActionContext.h"
#include "actions/uActionForms.h"

namespace zm {

/// Raised when a control of another class stands where an edit is needed.
class EInvalidCast : public std::runtime_error {
public:
    EInvalidCast() : std::runtime_error("Invalid class typecast") {}
};

/// A live form over its design. Belongs to one call of the host. Rules read and write controls by
/// name; an unknown name is a fault of the program.
class TActionForm : public IActionForm {
public:
    /// Opens with the defaults. The design must outlive the form.
    explicit TActionForm(const TActionFormDesign& design);

    /// Takes each key or its default. An index that is none of a control's items gives the
    /// default as well.
    void Load(const IStepParams& params);
    /// Clears the settings, then stores each key in the order of the controls. An empty text
    /// stores no key.
    void Store(IStepSettings& settings) const;

    const TActionFormDesign& Design() const override { return design_; }
    const TFormControlState& State(std::int32_t control) const override;
    TFormResult Result() const override { return result_; }
    void AttachView(IActionFormView* view) override { view_ = view; }

    void SetText(std::int32_t control, const std::u16string& text) override;
    void SetIndex(std::int32_t control, std::int32_t index) override;
    void SetChecked(std::int32_t control, bool checked) override;
    void PressButton(std::int32_t control) override;
    std::int32_t PressInsertVariable(std::int32_t active_control, std::int32_t caret) override;

    // For the rules.
    std::int32_t IndexOf(std::u16string_view name) const;
    const TFormControlState& State(std::u16string_view name) const { return State(IndexOf(name)); }
    /// Changes a text or caption without a change of the user's.
    void PutText(std::u16string_view name, const std::u16string& text);
    /// Enables or greys a control and recolours it by its class; a label takes the control that
    /// it names along.
    void EnableControls(std::u16string_view name, bool Enabled);

private:
    const TFormControl& Control(std::int32_t control) const;
    TFormControlState& MutableState(std::int32_t control);
    bool Accepts(std::int32_t control, TFormControlKind kind) const;
    void Notify(std::int32_t control, std::uint8_t changes);
    void Event(const std::function<void()>& body);
    void ApplyRules();
    void ChangeText(std::int32_t control, const std::u16string& text);
    void ChangeColor(std::int32_t control, TColor color);
    void PickCustomColor(std::int32_t control);
    void PickFileInto(std::int32_t target, TFilePick pick);
    void PickFontInto(std::int32_t target);
    void PressOk();
    void Close(TFormResult result);

    const TActionFormDesign& design_;
    std::vector<TFormControlState> states_;
    IActionFormView* view_ = nullptr;
    TFormResult result_ = frNone;
};

/// What a picker of image files offers: the extensions that can be read, or the ones of the
/// formats that a step can save in; then all files.
std::vector<TFileFilter> ImageFileFilters(TFilePick pick);

/// Shows a form over the settings; True when the user confirmed and the settings are stored
/// afresh. When no window can be shown the host's log is told why.
bool ConfigureStep(const TActionFormDesign& design, IStepSettings& settings);

// The forms of the actions, each declared in the source named after its action.
const TActionFormDesign& OpenImageForm();
const TActionFormDesign& SaveImageForm();
const TActionFormDesign& ResizeImageForm();
const TActionFormDesign& CropImageForm();
const TActionFormDesign& RotateImageForm();
const TActionFormDesign& TextOnImageForm();
const TActionFormDesign& ImageOnImageForm();
const TActionFormDesign& AddBorderForm();

}  // namespace zm
