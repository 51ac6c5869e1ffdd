#include "host/qvedit.h"

#include <algorithm>
#include <utility>

#include "engine/foundation/zmstreams.h"
#include "engine/foundation/zmstrings.h"
#include "host/qvrunner.h"

namespace zm::qvrun {
namespace {

constexpr char16_t kUnknownAction[] = u"This plug-in has no such action.";

}  // namespace

TJobEditor::TJobEditor(const THost& host, std::u16string file_name, IJobEditorWindow* window)
    : host_(host), file_name_(std::move(file_name)), window_(window) {
    for (std::int32_t index = 0; index < host_.ActionCount(); ++index) {
        action_names_.push_back(host_.Action(index).name);
    }
}

bool TJobEditor::Open(const std::optional<std::string>& text, TJobFileError& error) {
    if (!document_.Parse(text.value_or(""), error)) {
        return false;
    }
    saved_text_ = document_.Text();
    return true;
}

std::vector<TStepLine> TJobEditor::Steps() const {
    std::vector<TStepLine> lines;
    for (std::size_t index = 0; index < document_.StepCount(); ++index) {
        const TJobStep step = document_.Step(index);
        const auto action = FindAction(step.action, host_);
        lines.push_back(
            action ? TStepLine{host_.Action(*action).name, host_.Describe(*action, step.text)}
                   : TStepLine{step.action, kUnknownAction});
    }
    return lines;
}

bool TJobEditor::AddStep(std::size_t action, std::size_t position) {
    if (action >= action_names_.size()) {
        return false;
    }
    const auto text = host_.Configure(static_cast<std::int32_t>(action), u"", *this);
    if (text) {
        document_.InsertStep(std::min(position, document_.StepCount()), action_names_[action],
                             *text);
    }
    return text.has_value();
}

bool TJobEditor::ConfigureStep(std::size_t step) {
    if (step >= document_.StepCount()) {
        return false;
    }
    const TJobStep present = document_.Step(step);
    const auto action = FindAction(present.action, host_);
    if (!action) {
        AddLogLine(kUnknownAction);
        return false;
    }
    const auto text = host_.Configure(*action, present.text, *this);
    if (text) {
        document_.SetStepText(step, *text);
    }
    return text.has_value();
}

void TJobEditor::RemoveStep(std::size_t step) {
    if (step < document_.StepCount()) {
        document_.RemoveStep(step);
    }
}

void TJobEditor::MoveStep(std::size_t from, std::size_t to) {
    if (from < document_.StepCount() && to < document_.StepCount()) {
        document_.MoveStep(from, to);
    }
}

bool TJobEditor::Save(std::u16string& reason) {
    const std::string text = document_.Text();
    try {
        TZmSaveFileStream file(file_name_);
        file.WriteBuffer(text.data(), text.size());
        if (!file.Commit()) {
            reason = u"The file could not be written whole; it is as it was.";
            return false;
        }
    } catch (const std::exception& error) {
        reason = Utf16FromUtf8(error.what());
        return false;
    }
    saved_text_ = text;
    return true;
}

std::vector<std::u16string> TJobEditor::TakeLog() {
    return std::exchange(log_, {});
}

std::u16string TJobEditor::SelectVariable() {
    return window_ == nullptr ? std::u16string() : window_->PickVariable(KnownVariables());
}

}  // namespace zm::qvrun
