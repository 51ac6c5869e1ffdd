#include "host/qvrunner.h"

#include <algorithm>
#include <atomic>
#include <mutex>
#include <optional>
#include <thread>

#include "engine/foundation/zmstrings.h"

namespace zm::qvrun {
namespace {

TJobVariables VariablesOfJob(const TRunRequest& request, std::size_t index) {
    TJobVariables variables;
    variables.file = request.files[index];
    variables.out = request.output_folder;
    variables.index = static_cast<std::int32_t>(index) + 1;
    variables.user = request.user_variables;
    SetVariablesClock(variables);
    return variables;
}

/// Runs the steps of one job up to the first that fails.
TJobOutcome RunOneJob(const THost& host, const TRunRequest& request, std::size_t index) {
    TJobOutcome outcome;
    outcome.index = index;
    outcome.succeeded = true;
    THostJob job(host, static_cast<std::uint32_t>(index) + 1, VariablesOfJob(request, index));
    for (std::size_t number = 0; number < request.steps.size(); ++number) {
        const TRunStep& step = request.steps[number];
        if (request.report_steps) {
            outcome.step_descriptions.push_back(host.Describe(step.action_index, step.text));
        }
        if (!job.RunStep(step.action_index, static_cast<std::int32_t>(number) + 1, step.text)) {
            outcome.succeeded = false;
            outcome.failed_step = number;
            break;
        }
    }
    job.Stop();
    outcome.code = job.LastErrorCode();
    outcome.text = job.LastErrorText();
    outcome.log = job.Log();
    return outcome;
}

}  // namespace

std::optional<std::int32_t> FindAction(const std::u16string& wanted, const THost& host) {
    for (std::int32_t index = 0; index < host.ActionCount(); ++index) {
        const THostAction action = host.Action(index);
        if (AsciiEqualNoCase(wanted, action.name) || AsciiEqualNoCase(wanted, action.id)) {
            return index;
        }
    }
    return std::nullopt;
}

bool ResolveSteps(const TJobFile& job, const THost& host, std::vector<TRunStep>& steps,
                  TJobFileError& error) {
    steps.clear();
    for (const TJobStep& step : job.steps) {
        const auto index = FindAction(step.action, host);
        if (!index) {
            error = {step.line, "unknown action \"" + Utf8FromUtf16(step.action) +
                                    "\" (qvrun actions lists them)"};
            return false;
        }
        steps.push_back({*index, host.Action(*index).name, step.text, step.line});
    }
    return true;
}

std::size_t RunJobs(const THost& host, const TRunRequest& request, const TJobEndEvent& on_end) {
    std::atomic<std::size_t> next{0};
    std::mutex end_lock;
    std::size_t failures = 0;
    const auto work = [&] {
        for (std::size_t index = next++; index < request.files.size(); index = next++) {
            const TJobOutcome outcome = RunOneJob(host, request, index);
            const std::lock_guard guard(end_lock);
            failures += outcome.succeeded ? 0 : 1;
            on_end(outcome);
        }
    };
    const std::size_t workers = std::min<std::size_t>(
        static_cast<std::size_t>(std::max(request.workers, 1)), request.files.size());
    std::vector<std::jthread> threads;
    for (std::size_t count = 1; count < workers; ++count) {
        threads.emplace_back(work);
    }
    work();
    threads.clear();
    return failures;
}

std::vector<std::u16string> DescribeSteps(const THost& host, const std::vector<TRunStep>& steps) {
    std::vector<std::u16string> lines;
    for (const TRunStep& step : steps) {
        lines.push_back(IntegerToText(static_cast<std::int64_t>(lines.size()) + 1) + u". " +
                        host.Describe(step.action_index, step.text));
    }
    return lines;
}

}  // namespace zm::qvrun
