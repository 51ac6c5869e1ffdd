#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

#include "actions/uActionFormModel.h"
#include "plugin/uQVPluginUtils.h"

/// Forms without a window: settings as texts, and a view that a test plays.
namespace zm::test {

inline TQVPluginParams Settings(const std::u16string& text) {
    TAFActionParams record{};
    record.PPtr = const_cast<char16_t*>(text.c_str());
    return TQVPluginParams(record);
}

/// Settings that keep the lines in the order in which they are stored.
class TLineCollector : public TQVPluginParams {
public:
    TLineCollector() : TQVPluginParams(TAFActionParams{}), text(u"not cleared\n") {}
    void SetString(std::u16string_view key, std::u16string_view value) override {
        if (!value.empty()) {
            text.append(key).append(u"=").append(value).append(u"\n");
        }
    }
    void Clear() override { text.clear(); }

    std::u16string text;
};

/// Remembers what the form asks of it and answers as the test has set.
class TTestView : public IActionFormView {
public:
    void ControlChanged(std::int32_t control, std::uint8_t changes) override {
        told.push_back({control, changes});
        if (on_change) {
            on_change(control, changes);
        }
    }
    void CloseWindow() override { ++closed; }
    bool PickFile(TFilePick pick, const std::vector<TFileFilter>& filters,
                  const std::u16string& folder, std::u16string& name) override {
        file_picks.push_back({pick, folder});
        offered_filters = filters;
        name = picked_file;
        return !picked_file.empty();
    }
    bool PickFont(TFormFont& font) override {
        offered_font = font;
        font = picked_font;
        return confirms;
    }
    bool PickColor(TColor& color) override {
        offered_color = color;
        color = picked_color;
        return confirms;
    }
    void Beep(std::uint32_t sound) override { beeps.push_back(sound); }
    void ShowError(const std::u16string& message) override { errors.push_back(message); }

    struct TChange {
        std::int32_t control;
        int changes;
        friend bool operator==(const TChange&, const TChange&) = default;
    };
    struct TPick {
        TFilePick pick;
        std::u16string folder;
        friend bool operator==(const TPick&, const TPick&) = default;
    };
    std::vector<TChange> told;
    std::function<void(std::int32_t, std::uint8_t)> on_change;
    std::vector<TPick> file_picks;
    std::vector<TFileFilter> offered_filters;
    std::vector<std::uint32_t> beeps;
    std::vector<std::u16string> errors;
    std::u16string picked_file;
    TFormFont offered_font;
    TFormFont picked_font;
    TColor offered_color = -1;
    TColor picked_color = 0;
    bool confirms = true;
    int closed = 0;
};

/// A form that was loaded from a text, with a view, driven by the names of its controls.
struct TDrivenForm {
    explicit TDrivenForm(const TActionFormDesign& design, const std::u16string& text = u"")
        : form(design) {
        form.Load(Settings(text));
        form.AttachView(&view);
    }
    void Type(const char16_t* name, const std::u16string& text) {
        form.SetText(form.IndexOf(name), text);
    }
    void Choose(const char16_t* name, std::int32_t index) {
        form.SetIndex(form.IndexOf(name), index);
    }
    void Check(const char16_t* name, bool checked) { form.SetChecked(form.IndexOf(name), checked); }
    void Press(const char16_t* name) { form.PressButton(form.IndexOf(name)); }
    const TFormControlState& State(const char16_t* name) const { return form.State(name); }
    /// The lines that OK would store.
    std::u16string Stored() const {
        TLineCollector settings;
        form.Store(settings);
        return settings.text;
    }

    TTestView view;
    TActionForm form;
};

/// Every form, in the order of the actions.
inline std::vector<const TActionFormDesign*> AllForms() {
    return {&OpenImageForm(),   &SaveImageForm(),   &ResizeImageForm(),  &CropImageForm(),
            &RotateImageForm(), &TextOnImageForm(), &ImageOnImageForm(), &AddBorderForm()};
}

}  // namespace zm::test
