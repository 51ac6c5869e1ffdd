#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

/// Job files of qvrun: UTF-8 text with a section per step.
namespace zm::qvrun {

/// One step as written: the section's head and its key=value lines, exactly as a host keeps them.
struct TJobStep {
    std::u16string action;  ///< text between the brackets, blanks around it removed
    std::u16string text;    ///< lines, each ended by CR LF; empty when the section has none
    std::int32_t line = 0;  ///< of the section's head, from 1
};

struct TJobFile {
    std::vector<TJobStep> steps;
    /// Whether some value refers to the file that the job is run for ({file}, {dir}, ...).
    bool uses_input_file = false;
};

/// What one line of a job file is. Lines come without their ends.
enum TJobLineKind : std::uint8_t {
    jlNothing,  ///< blank or a comment (first non-blank character # or ;)
    jlHead,     ///< `[action]`
    jlSetting,  ///< `key=value`
    jlFault,
};

struct TJobLine {
    TJobLineKind kind = jlNothing;
    std::u16string action;  ///< of a head: text between the brackets, blanks around it removed
    std::string fault;      ///< UTF-8
};

TJobLine ReadJobLine(std::u16string_view line);

struct TJobFileError {
    std::int32_t line = 0;  ///< from 1; 0 when the fault is the file as a whole
    std::string message;    ///< UTF-8, without place
};

/// Byte order mark that a job text may begin with.
inline constexpr std::string_view kByteOrderMark = "\xEF\xBB\xBF";

/// Parses a job text. True when `job` holds at least one step; otherwise `error`
/// tells the first fault.
[[nodiscard]] bool ParseJobText(std::string_view text, TJobFile& job, TJobFileError& error);

}  // namespace zm::qvrun
