#include "actions/uActionFormModel.h"

#include <algorithm>
#include <exception>

#include "actions/uColorNames.h"
#include "engine/foundation/zmassert.h"
#include "engine/foundation/zmstrings.h"

namespace zm {
namespace {

constexpr std::int32_t kKnownFontStyles = ffBold | ffItalic | ffUnderline | ffStrikeOut;

TFormToolkitProvider installed_provider = nullptr;

bool ItemExists(const TFormControl& control, std::int32_t index) {
    return index >= 0 && static_cast<std::size_t>(index) < control.items.size();
}

/// An edit's text is one line of the stored settings: a line break inside would start a key of
/// its own there.
std::u16string SingleLine(const std::u16string& text) {
    return text.substr(0, text.find_first_of(std::u16string_view(u"\r\n\0", 3)));
}

bool SplitsSurrogates(const std::u16string& text, std::size_t position) {
    return position > 0 && position < text.size() && (text[position - 1] & 0xFC00) == 0xD800 &&
           (text[position] & 0xFC00) == 0xDC00;
}

TFormFont LoadFont(const IStepParams& params, const std::u16string& key) {
    TFormFont font;
    font.name = params.GetStringDef(key + u"_name", font.name);
    font.size = params.GetIntegerDef(key + u"_size", font.size);
    font.color = params.GetIntegerDef(key + u"_color", font.color);
    font.styles = static_cast<std::uint8_t>(params.GetIntegerDef(key + u"_styles", font.styles) &
                                            kKnownFontStyles);
    return font;
}

void StoreFont(IStepSettings& settings, const std::u16string& key, const TFormFont& font) {
    settings.SetString(key + u"_name", font.name);
    settings.SetInteger(key + u"_size", font.size);
    settings.SetInteger(key + u"_color", font.color);
    settings.SetInteger(key + u"_styles", font.styles);
}

void SetColor(TFormControlState& state, TColor color) {
    state.color = color;
    state.index = ColorBoxIndex(color);
}

void LoadControl(const TFormControl& control, const IStepParams& params, TFormControlState& state) {
    switch (control.kind) {
        case fcEdit:
            state.text = SingleLine(params.GetStringDef(control.key, control.default_text));
            break;
        case fcComboBox:
        case fcRadioGroup:
            state.index = params.GetIntegerDef(control.key, control.default_value);
            if (!ItemExists(control, state.index)) {
                state.index = control.default_value;
            }
            break;
        case fcCheckBox:
            state.checked = params.GetBoolDef(control.key, control.default_value != 0);
            break;
        case fcColorBox:
            SetColor(state, params.GetIntegerDef(control.key, control.default_value));
            break;
        case fcSamplePanel: state.font = LoadFont(params, control.key); break;
        default: break;
    }
}

void StoreControl(const TFormControl& control, const TFormControlState& state,
                  IStepSettings& settings) {
    switch (control.kind) {
        case fcEdit: settings.SetString(control.key, state.text); break;
        case fcComboBox:
        case fcRadioGroup: settings.SetInteger(control.key, state.index); break;
        case fcCheckBox: settings.SetBool(control.key, state.checked); break;
        case fcColorBox: settings.SetInteger(control.key, state.color); break;
        case fcSamplePanel: StoreFont(settings, control.key, state.font); break;
        default: break;
    }
}

/// A form without any stored settings.
class TNoParams : public IStepParams {
public:
    std::int32_t GetTaskId() const override { return 0; }
    std::u16string GetString(std::u16string_view) const override { return {}; }
    std::u16string GetStringDef(std::u16string_view, std::u16string_view text) const override {
        return std::u16string(text);
    }
    std::int32_t GetInteger(std::u16string_view) const override { return 0; }
    std::int32_t GetIntegerDef(std::u16string_view, std::int32_t value) const override {
        return value;
    }
    bool GetBool(std::u16string_view) const override { return false; }
    bool GetBoolDef(std::u16string_view, bool value) const override { return value; }
};

void TellNotShown(const std::u16string& reason) {
    HostServices().InfoOut(kInfoKindError, u"The settings dialog cannot be shown: " + reason);
}

}  // namespace

void InstallFormToolkit(TFormToolkitProvider provider) {
    installed_provider = provider;
}

TActionForm::TActionForm(const TActionFormDesign& design)
    : design_(design), states_(design.controls.size()) {
    for (std::size_t index = 0; index < states_.size(); ++index) {
        states_[index].text = design.controls[index].caption;
    }
    Load(TNoParams());
}

void TActionForm::Load(const IStepParams& params) {
    for (std::size_t index = 0; index < states_.size(); ++index) {
        LoadControl(design_.controls[index], params, states_[index]);
    }
    ApplyRules();
}

void TActionForm::Store(IStepSettings& settings) const {
    settings.Clear();
    for (std::size_t index = 0; index < states_.size(); ++index) {
        StoreControl(design_.controls[index], states_[index], settings);
    }
}

const TFormControl& TActionForm::Control(std::int32_t control) const {
    ZM_ASSERT(control >= 0 && static_cast<std::size_t>(control) < design_.controls.size());
    return design_.controls[static_cast<std::size_t>(control)];
}

const TFormControlState& TActionForm::State(std::int32_t control) const {
    ZM_ASSERT(control >= 0 && static_cast<std::size_t>(control) < states_.size());
    return states_[static_cast<std::size_t>(control)];
}

TFormControlState& TActionForm::MutableState(std::int32_t control) {
    return const_cast<TFormControlState&>(State(control));
}

std::int32_t TActionForm::IndexOf(std::u16string_view name) const {
    const auto found =
        std::find_if(design_.controls.begin(), design_.controls.end(),
                     [name](const TFormControl& control) { return control.name == name; });
    ZM_ASSERT(found != design_.controls.end());
    return static_cast<std::int32_t>(found - design_.controls.begin());
}

bool TActionForm::Accepts(std::int32_t control, TFormControlKind kind) const {
    return Control(control).kind == kind && State(control).enabled;
}

void TActionForm::Notify(std::int32_t control, std::uint8_t changes) {
    if (view_ != nullptr) {
        view_->ControlChanged(control, changes);
    }
}

void TActionForm::Event(const std::function<void()>& body) {
    // The callers above are a toolkit's own functions, which no exception may cross.
    try {
        body();
    } catch (const std::exception& error) {
        if (view_ != nullptr) {
            view_->ShowError(Utf16FromUtf8(error.what()));
        }
    }
}

void TActionForm::ApplyRules() {
    if (design_.apply_rules != nullptr) {
        design_.apply_rules(*this);
    }
}

void TActionForm::PutText(std::u16string_view name, const std::u16string& text) {
    const std::int32_t control = IndexOf(name);
    if (State(control).text != text) {
        MutableState(control).text = text;
        Notify(control, fchText);
    }
}

void TActionForm::EnableControls(std::u16string_view name, bool Enabled) {
    const std::int32_t control = IndexOf(name);
    const TFormControlKind kind = Control(control).kind;
    TFormControlState& state = MutableState(control);
    if (state.enabled != Enabled) {
        state.enabled = Enabled;
        if (kind == fcEdit || kind == fcComboBox) {
            state.background = Enabled ? kColorWindow : kColorBtnFace;
        }
        Notify(control, fchEnabled);
    }
    if (kind == fcLabel && !Control(control).focus_control.empty()) {
        EnableControls(Control(control).focus_control, Enabled);
    }
}

/// The user's change of an edit, also by a picker or a variable: rules and links follow.
void TActionForm::ChangeText(std::int32_t control, const std::u16string& text) {
    if (State(control).text == text) {
        return;
    }
    MutableState(control).text = text;
    if (design_.link != nullptr) {
        design_.link(*this, control);
    }
    ApplyRules();
}

void TActionForm::SetText(std::int32_t control, const std::u16string& text) {
    Event([&] {
        if (!Accepts(control, fcEdit)) {
            return;
        }
        const std::u16string line = SingleLine(text);
        ChangeText(control, line);
        if (line.size() != text.size()) {
            Notify(control, fchText);
        }
    });
}

void TActionForm::SetIndex(std::int32_t control, std::int32_t index) {
    Event([&] {
        const bool is_color_box = Accepts(control, fcColorBox);
        const bool takes_index =
            is_color_box || Accepts(control, fcComboBox) || Accepts(control, fcRadioGroup);
        if (!takes_index || !ItemExists(Control(control), index)) {
            return;
        }
        if (is_color_box && index == 0) {
            PickCustomColor(control);
        } else if (is_color_box) {
            ChangeColor(control, ColorBoxColor(index));
        } else if (State(control).index != index) {
            MutableState(control).index = index;
            ApplyRules();
        }
    });
}

void TActionForm::ChangeColor(std::int32_t control, TColor color) {
    SetColor(MutableState(control), color);
    Notify(control, fchIndex | fchColor);
}

void TActionForm::PickCustomColor(std::int32_t control) {
    TColor color = State(control).color;
    if (view_ == nullptr || !view_->PickColor(color)) {
        color = State(control).color;
    }
    ChangeColor(control, color);
}

void TActionForm::SetChecked(std::int32_t control, bool checked) {
    Event([&] {
        if (Accepts(control, fcCheckBox) && State(control).checked != checked) {
            MutableState(control).checked = checked;
            ApplyRules();
        }
    });
}

void TActionForm::PickFileInto(std::int32_t target, TFilePick pick) {
    std::u16string file_name;
    if (view_ != nullptr &&
        view_->PickFile(pick, ImageFileFilters(pick), FileFolder(State(target).text), file_name)) {
        ChangeText(target, SingleLine(file_name));
        Notify(target, fchText);
    }
}

void TActionForm::PickFontInto(std::int32_t target) {
    TFormFont font = State(target).font;
    if (view_ != nullptr && view_->PickFont(font)) {
        font.name = SingleLine(font.name);
        font.styles &= kKnownFontStyles;
        MutableState(target).font = font;
        Notify(target, fchFont);
    }
}

void TActionForm::PressButton(std::int32_t control) {
    Event([&] {
        if (!Accepts(control, fcButton)) {
            return;
        }
        const TFormControl& button = Control(control);
        switch (button.button) {
            case fbOk: PressOk(); break;
            case fbCancel: Close(frCancel); break;
            case fbOpenFile: PickFileInto(IndexOf(button.target), fpOpen); break;
            case fbSaveFile: PickFileInto(IndexOf(button.target), fpSave); break;
            case fbFont: PickFontInto(IndexOf(button.target)); break;
            default: break;
        }
    });
}

void TActionForm::PressOk() {
    if (design_.check == nullptr || design_.check(*this)) {
        Close(frOk);
        return;
    }
    result_ = frNone;
    if (view_ != nullptr) {
        view_->Beep(kWarningBeep);
    }
}

void TActionForm::Close(TFormResult result) {
    result_ = result;
    if (view_ != nullptr) {
        view_->CloseWindow();
    }
}

std::int32_t TActionForm::PressInsertVariable(std::int32_t active_control, std::int32_t caret) {
    std::int32_t new_caret = caret;
    Event([&] {
        const std::u16string name = SingleLine(SelectVariable());
        if (name.empty()) {
            return;
        }
        if (active_control < 0 || Control(active_control).kind != fcEdit) {
            throw EInvalidCast();
        }
        std::u16string text = State(active_control).text;
        const auto length = static_cast<std::int64_t>(text.size());
        auto position = static_cast<std::size_t>(std::clamp<std::int64_t>(caret, 0, length));
        position += SplitsSurrogates(text, position) ? 1 : 0;
        text.insert(position, name);
        ChangeText(active_control, text);
        Notify(active_control, fchText);
        new_caret = static_cast<std::int32_t>(position + name.size());
    });
    return new_caret;
}

bool ConfigureStep(const TActionFormDesign& design, IStepSettings& settings) {
    std::u16string reason = u"this program brings no dialogs.";
    IActionFormToolkit* toolkit =
        installed_provider == nullptr ? nullptr : installed_provider(reason);
    if (toolkit == nullptr) {
        TellNotShown(reason);
        return false;
    }
    TActionForm form(design);
    form.Load(settings);
    const TFormShowOptions options{HostServices().DefaultScale(), HostServices().MainWindow()};
    const bool shown = toolkit->ShowModal(form, options, reason);
    if (!shown) {
        TellNotShown(reason);
    }
    if (!shown || form.Result() != frOk) {
        return false;
    }
    form.Store(settings);
    return true;
}

}  // namespace zm
