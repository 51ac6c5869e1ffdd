#pragma once

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "host/qvjobfile.h"

namespace zm::qvrun {

/// A job file as it is edited: every byte that no edit concerns stays as it is, among them
/// comments, blank lines, line ends and the order of the keys.
///
/// Lines above the first section belong to the file and stay at its top. Comments directly above
/// another section's head belong to that section and go where it goes.
class TJobDocument {
public:
    /// Takes a job text; it may be empty or have no step. False with the first fault otherwise,
    /// and the document is as it was.
    [[nodiscard]] bool Parse(std::string_view text, TJobFileError& error);
    /// The whole text. Without an edit it is the one that was parsed.
    std::string Text() const;

    std::size_t StepCount() const { return steps_.size(); }
    /// The step as a host stores it. `line` is of the present text.
    TJobStep Step(std::size_t index) const;

    /// Adds a section before the step at `index`, or at the end.
    void InsertStep(std::size_t index, const std::u16string& action,
                    const std::u16string& step_text);
    void RemoveStep(std::size_t index);
    /// Takes the step at `from` out and puts it back as the step number `to`.
    void MoveStep(std::size_t from, std::size_t to);
    /// Gives the step other settings, lines `key=value`. Lines of kept keys stay in their places,
    /// new keys follow the last key, keys that are not in the text go.
    void SetStepText(std::size_t index, const std::u16string& step_text);

private:
    /// A line with its own end, which only the last of a file may lack.
    struct TLine {
        std::u16string text;
        std::u16string end;
    };
    using TLines = std::vector<TLine>;
    struct TSection {
        TLines lines;  ///< comments above, the head, all lines below
        std::size_t head = 0;
        std::u16string action;
    };

    void AddSection(TLine head, std::u16string action);
    TSection NewSection(const std::u16string& action, const std::u16string& step_text) const;
    /// Gives the last line an end when another one is to follow it.
    void EndLastLine();
    void SeparateFromBefore(std::size_t index);
    TLines KeptLines(const TSection& section, TLines& wanted) const;

    bool has_byte_order_mark_ = false;
    std::u16string line_end_ = u"\n";  ///< of new lines: the text's first
    TLines preamble_;
    std::vector<TSection> steps_;
};

}  // namespace zm::qvrun
