#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "engine/platform/module.h"
#include "host/qvvariables.h"
#include "plugin/AFTypes.h"

/// qvrun's side of the host contract: the record of callbacks, the plug-in's records, and jobs.
namespace zm::qvrun {

class THostJob;

struct THostAction {
    std::u16string name;
    std::u16string id;
};

/// Someone at the screen: what the plug-in asks for and tells outside of jobs, on the same thread.
class IHostDesk {
public:
    virtual ~IHostDesk() = default;
    virtual void AddLogLine(const std::u16string& line) = 0;
    /// A variable with its braces, or empty when none was picked.
    virtual std::u16string SelectVariable() = 0;
};

/// A loaded plug-in. One per process. After Load its members may be called from any thread.
class THost {
public:
    THost();
    ~THost();
    THost(const THost&) = delete;
    THost& operator=(const THost&) = delete;

    /// Loads the module and runs its entry; False with the reason (UTF-8) in `error_text`.
    [[nodiscard]] bool Load(const std::u16string& module_path, std::string& error_text);
    std::int32_t ActionCount() const;
    THostAction Action(std::int32_t index) const;
    /// The plug-in's one-line description of a step.
    std::u16string Describe(std::int32_t action_index, const std::u16string& step_text) const;
    /// Shows the plug-in's dialog for a step. The step's new text; nothing when it stays, because
    /// the user cancelled or because of what the desk's log then tells.
    std::optional<std::u16string> Configure(std::int32_t action_index,
                                            const std::u16string& step_text, IHostDesk& desk) const;

private:
    friend class THostJob;

    TAFAppInfo app_info_{};
    std::unique_ptr<platform::TLibrary> library_;
    TAFPluginInfo* plugin_info_ = nullptr;
};

/// One running job. Belongs to the thread that made it: the host's callbacks carry no job, so
/// that the job in hand is the thread's own.
class THostJob {
public:
    THostJob(const THost& host, std::uint32_t task_id, TJobVariables variables);
    ~THostJob();
    THostJob(const THostJob&) = delete;
    THostJob& operator=(const THostJob&) = delete;

    /// Runs one step; False when the action failed or an exception came out of the plug-in.
    [[nodiscard]] bool RunStep(std::int32_t action_index, std::int32_t step_number,
                               const std::u16string& step_text);
    /// Tells the actions that ran that the job has ended; the second call does nothing.
    void Stop();

    std::int32_t LastErrorCode() const { return error_code_; }
    const std::u16string& LastErrorText() const { return error_text_; }
    const std::vector<std::u16string>& Log() const { return log_; }

    /// The job that runs on the calling thread, or nil.
    static THostJob* Current();
    // Callbacks of the plug-in for this job.
    void SetError(std::int32_t code, std::u16string text);
    void AddLogLine(std::u16string line) { log_.push_back(std::move(line)); }
    const TJobVariables& Variables() const { return variables_; }

private:
    struct TRunStepRecord {
        std::int32_t action_index;
        std::int32_t step_number;
        std::u16string text;
    };

    const THost& host_;
    std::uint32_t task_id_;
    TJobVariables variables_;
    std::vector<TRunStepRecord> run_steps_;
    bool stopped_ = false;
    std::int32_t error_code_ = 0;
    std::u16string error_text_;
    std::vector<std::u16string> log_;
};

}  // namespace zm::qvrun
