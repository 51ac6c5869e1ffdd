#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "host/qvvariables.h"

/// The seam between the job editor and its window, which may lie in a module of its own: calls go
/// through virtual functions only, and all on one thread.
namespace zm::qvrun {

struct TStepLine {
    std::u16string action;       ///< name of the action, or what the file calls an unknown one
    std::u16string description;  ///< what it does with the present settings
};

/// The job under edit. Steps count from 0; an index that is none does nothing.
class IJobEditor {
public:
    virtual ~IJobEditor() = default;
    virtual const std::u16string& FileName() const = 0;
    /// Names of the actions, by the index that AddStep takes.
    virtual const std::vector<std::u16string>& ActionNames() const = 0;
    virtual std::vector<TStepLine> Steps() const = 0;

    /// Opens the action's dialog and puts the step in when it was confirmed. False otherwise.
    virtual bool AddStep(std::size_t action, std::size_t position) = 0;
    /// Opens the step's dialog; False when nothing was confirmed.
    virtual bool ConfigureStep(std::size_t step) = 0;
    virtual void RemoveStep(std::size_t step) = 0;
    virtual void MoveStep(std::size_t from, std::size_t to) = 0;

    virtual bool IsChanged() const = 0;
    /// False with a sentence in `reason` when the file could not be written; it then is as it was.
    virtual bool Save(std::u16string& reason) = 0;
    /// What the plug-in has told since the last call, such as why a dialog did not open.
    virtual std::vector<std::u16string> TakeLog() = 0;
};

class IJobEditorWindow {
public:
    virtual ~IJobEditorWindow() = default;
    /// Shows the job until the user closes the window.
    virtual void Run(IJobEditor& editor) = 0;
    /// Lets the user pick one of the variables; its reference, or empty.
    virtual std::u16string PickVariable(const std::vector<TVariableInfo>& variables) = 0;
};

/// Where the window is a module: its file name beside qvrun, and the name that it exports. The
/// result is nil, with a sentence in `reason`, when there is no display.
inline constexpr char16_t kEditWindowModuleName[] = u"qvrun-gtk.so";
inline constexpr char kEditWindowEntryName[] = "ZmJobEditorWindow";
using TJobEditorWindowEntry = IJobEditorWindow* (*)(std::u16string& reason);

}  // namespace zm::qvrun
