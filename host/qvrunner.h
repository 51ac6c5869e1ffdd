#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "host/qvhost.h"
#include "host/qvjobfile.h"
#include "host/qvvariables.h"

/// Running a job file over files: one job per file, several at a time.
namespace zm::qvrun {

/// A step made ready for the plug-in.
struct TRunStep {
    std::int32_t action_index = 0;
    std::u16string action_name;
    std::u16string text;    ///< key=value lines
    std::int32_t line = 0;  ///< in the job file
};

/// Index of the plug-in's action by its name or ActionID, without case; nothing when it has none.
std::optional<std::int32_t> FindAction(const std::u16string& wanted, const THost& host);

/// Finds the plug-in's action for each step. False with the first unknown one in `error`.
[[nodiscard]] bool ResolveSteps(const TJobFile& job, const THost& host,
                                std::vector<TRunStep>& steps, TJobFileError& error);

struct TRunRequest {
    std::vector<TRunStep> steps;
    std::vector<std::u16string> files;  ///< one job each
    std::u16string output_folder;
    std::map<std::u16string, std::u16string> user_variables;
    std::int32_t workers = 1;   ///< jobs at a time, at least 1
    bool report_steps = false;  ///< collect the description of each step as it runs
};

/// What became of one job.
struct TJobOutcome {
    std::size_t index = 0;  ///< in TRunRequest::files
    bool succeeded = false;
    std::size_t failed_step = 0;      ///< in TRunRequest::steps, when it did not
    std::int32_t code = 0;            ///< the step's last error; 0 when it reported none
    std::u16string text;              ///< its text, or why there is none
    std::vector<std::u16string> log;  ///< lines that the plug-in wrote to the host's log
    std::vector<std::u16string> step_descriptions;
};

/// Called once per job as it ends, in the order of ending; never from two threads at once.
using TJobEndEvent = std::function<void(const TJobOutcome& outcome)>;

/// Runs all jobs; a step that fails ends its job, JobStop is sent at the end of each. Returns
/// how many jobs failed.
std::size_t RunJobs(const THost& host, const TRunRequest& request, const TJobEndEvent& on_end);

/// One description line per step, of the stored text, numbered from 1.
std::vector<std::u16string> DescribeSteps(const THost& host, const std::vector<TRunStep>& steps);

}  // namespace zm::qvrun
