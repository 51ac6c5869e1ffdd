#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <string_view>
#include <vector>

/// The variables of qvrun, written in braces in a job's values.
namespace zm::qvrun {

/// What the variables of one job stand for.
struct TJobVariables {
    std::u16string file;     ///< {file}; {dir}, {name} and {ext} are its parts
    std::u16string out;      ///< {out}: the output folder, without a trailing separator
    std::int32_t index = 1;  ///< {index}: number of the job, from 1
    std::u16string date;     ///< {date}: year-month-day at the start of the job, 2026-11-21
    std::u16string time;     ///< {time}: hour-minute-second, 14-05-09, fit for file names
    std::map<std::u16string, std::u16string> user;  ///< --set; they win over all others
};

/// A variable as it is offered to someone who writes a job.
struct TVariableInfo {
    std::u16string reference;  ///< as it is written, with its braces
    std::u16string meaning;    ///< a few words in English
};

/// All variables that every job has.
const std::vector<TVariableInfo>& KnownVariables();

/// Fills `date` and `time` from the local clock.
void SetVariablesClock(TJobVariables& variables);

/// Replaces every known variable; the result is not searched again. A reference that is not
/// known stays as it stands; {env:NAME} of an unset name is empty.
std::u16string ExpandJobText(std::u16string_view text, const TJobVariables& variables);

}  // namespace zm::qvrun
