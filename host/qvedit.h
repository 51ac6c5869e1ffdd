#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "host/qveditwindow.h"
#include "host/qvhost.h"
#include "host/qvjobdocument.h"

/// Editing a job file: the job, its steps' dialogs and its file, without the window.
namespace zm::qvrun {

class TJobEditor : public IJobEditor, private IHostDesk {
public:
    /// The host and the window outlive the editor. Without a window no variables are offered.
    TJobEditor(const THost& host, std::u16string file_name, IJobEditorWindow* window);

    /// Takes the file's text; a file that isn't there is an empty job. False with the first
    /// fault.
    [[nodiscard]] bool Open(const std::optional<std::string>& text, TJobFileError& error);

    const std::u16string& FileName() const override { return file_name_; }
    const std::vector<std::u16string>& ActionNames() const override { return action_names_; }
    std::vector<TStepLine> Steps() const override;
    bool AddStep(std::size_t action, std::size_t position) override;
    bool ConfigureStep(std::size_t step) override;
    void RemoveStep(std::size_t step) override;
    void MoveStep(std::size_t from, std::size_t to) override;
    bool IsChanged() const override { return document_.Text() != saved_text_; }
    bool Save(std::u16string& reason) override;
    std::vector<std::u16string> TakeLog() override;

    const TJobDocument& Document() const { return document_; }

private:
    void AddLogLine(const std::u16string& line) override { log_.push_back(line); }
    std::u16string SelectVariable() override;

    const THost& host_;
    std::u16string file_name_;
    IJobEditorWindow* window_;
    std::vector<std::u16string> action_names_;
    TJobDocument document_;
    std::string saved_text_;
    std::vector<std::u16string> log_;
};

/// The editor's window, defined by the view of the system that the program was built for; where
/// that is a module, it lies in the folder (with trailing separator). Nil with a sentence in
/// `reason`. It lives to the end of the process.
IJobEditorWindow* FindEditWindow(const std::u16string& folder, std::u16string& reason);

}  // namespace zm::qvrun
