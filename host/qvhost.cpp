#include "host/qvhost.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <cstring>

#include "engine/foundation/zmassert.h"
#include "engine/platform/hostboundary.h"

namespace zm::qvrun {
namespace {

constexpr char16_t kHostVersion[] = u"8.3";
constexpr char16_t kSilentFailure[] = u"the action failed without telling why: ";

// The callbacks carry no job, and every job has a thread of its own.
thread_local THostJob* current_job = nullptr;
// Who is asked while a dialog of the plug-in is open.
thread_local IHostDesk* current_desk = nullptr;

void ZM_STDCALL GetMemory(void** block, std::int32_t size_bytes) {
    *block = size_bytes < 0 ? nullptr : std::malloc(static_cast<std::size_t>(size_bytes));
}

void ZM_STDCALL FreeMemory(void** block, std::int32_t) {
    std::free(*block);
    *block = nullptr;
}

void ZM_STDCALL InfoOut(std::int32_t, const char16_t* text) {
    if (current_job != nullptr && text != nullptr) {
        current_job->AddLogLine(text);
    } else if (current_desk != nullptr && text != nullptr) {
        current_desk->AddLogLine(text);
    }
}

void ZM_STDCALL SetLastError(std::int32_t, std::int32_t code, const char16_t* text) {
    if (current_job != nullptr) {
        current_job->SetError(code, text == nullptr ? std::u16string() : text);
    }
}

/// What fits of the expanded text, always terminated; the status tells that not all of it did.
void ZM_STDCALL ExpandText(const char16_t* text, char16_t* buffer, std::int32_t* size_bytes,
                           std::int32_t* status) {
    const std::u16string expanded = current_job == nullptr
                                        ? std::u16string(text)
                                        : ExpandJobText(text, current_job->Variables());
    const auto room = static_cast<std::size_t>(std::max(*size_bytes, 0)) / sizeof(char16_t);
    const bool fits = expanded.size() < room;
    if (room > 0) {
        const std::size_t length = std::min(expanded.size(), room - 1);
        std::copy_n(expanded.data(), length, buffer);
        buffer[length] = u'\0';
    }
    *status = fits ? 0 : 1;
    if (!fits) {
        *size_bytes = static_cast<std::int32_t>((expanded.size() + 1) * sizeof(char16_t));
    }
}

/// Where nobody sits at the screen no variable is picked.
void ZM_STDCALL SelectVar(char16_t* buffer, std::int32_t max_length) {
    if (max_length <= 0) {
        return;
    }
    const std::u16string picked =
        current_desk == nullptr ? std::u16string() : current_desk->SelectVariable();
    const std::size_t length = std::min(picked.size(), static_cast<std::size_t>(max_length) - 1);
    std::copy_n(picked.data(), length, buffer);
    buffer[length] = u'\0';
}

/// The parameters of one call; the block belongs to the host's heap, as the contract has it.
class TCallParams {
public:
    TCallParams(const std::u16string& text, std::uint32_t task_id, std::int32_t step_number) {
        params_.Size = static_cast<std::int32_t>((text.size() + 1) * sizeof(char16_t));
        GetMemory(&params_.PPtr, params_.Size);
        if (params_.PPtr == nullptr) {
            throw std::bad_alloc();
        }
        std::memcpy(params_.PPtr, text.c_str(), static_cast<std::size_t>(params_.Size));
        params_.TaskID = task_id;
        params_.StepNum = step_number;
    }
    ~TCallParams() { FreeMemory(&params_.PPtr, params_.Size); }
    TCallParams(const TCallParams&) = delete;
    TCallParams& operator=(const TCallParams&) = delete;
    TAFActionParams* Get() { return &params_; }
    /// The text as the plug-in has left it.
    std::u16string Text() const {
        const auto* text = static_cast<const char16_t*>(params_.PPtr);
        return text == nullptr ? std::u16string() : text;
    }

private:
    TAFActionParams params_{};
};

TAFAppInfo MakeAppInfo() {
    TAFAppInfo info{};
    info.Ver = kHostVersion;
    info.InfoOut = InfoOut;
    info.QVGetMemory = GetMemory;
    info.QVFreeMemory = FreeMemory;
    info.ExpandText = ExpandText;
    info.SelectVar = SelectVar;
    info.SetLastError = SetLastError;
    return info;
}

}  // namespace

THost::THost() : app_info_(MakeAppInfo()) {}

THost::~THost() {
    if (plugin_info_ != nullptr && plugin_info_->ShutdownPlugin != nullptr) {
        plugin_info_->ShutdownPlugin();
    }
}

bool THost::Load(const std::u16string& module_path, std::string& error_text) {
    library_ = platform::LoadLibraryFile(module_path, error_text);
    if (library_ == nullptr) {
        return false;
    }
    const auto entry = reinterpret_cast<TInitQVPlugin>(library_->FindSymbol(kInitQVPluginName));
    if (entry == nullptr) {
        error_text = "the module has no entry InitQVPlugin";
        return false;
    }
    plugin_info_ = entry(&app_info_);
    if (plugin_info_ == nullptr || plugin_info_->ActionsInfo == nullptr) {
        plugin_info_ = nullptr;
        error_text = "the module refuses this host";
        return false;
    }
    return true;
}

std::int32_t THost::ActionCount() const {
    return plugin_info_ == nullptr ? 0 : plugin_info_->ActionsInfo->ActionsCount;
}

THostAction THost::Action(std::int32_t index) const {
    ZM_ASSERT(index >= 0 && index < ActionCount());
    const TAFActionInfo* info = plugin_info_->ActionsInfo->GetActionInfo(index);
    return {info->Name, info->ActionID};
}

std::u16string THost::Describe(std::int32_t action_index, const std::u16string& step_text) const {
    std::array<char16_t, kDescriptionBufferLength> buffer{};
    TCallParams params(step_text, 0, 0);
    plugin_info_->ActionsInfo->ActionDescr(action_index, params.Get(), buffer.data());
    buffer.back() = u'\0';
    return buffer.data();
}

std::optional<std::u16string> THost::Configure(std::int32_t action_index,
                                               const std::u16string& step_text,
                                               IHostDesk& desk) const {
    TCallParams params(step_text, 0, 0);
    TLongBool result = kLongFalse;
    std::u16string exception_text;
    current_desk = &desk;
    const bool returned = platform::CallCatchingHostExceptions(
        [&] { result = plugin_info_->ActionsInfo->ConfigAction(action_index, params.Get()); },
        exception_text);
    current_desk = nullptr;
    if (!returned) {
        desk.AddLogLine(exception_text);
    }
    return returned && result != kLongFalse ? std::optional(params.Text()) : std::nullopt;
}

THostJob::THostJob(const THost& host, std::uint32_t task_id, TJobVariables variables)
    : host_(host), task_id_(task_id), variables_(std::move(variables)) {
    ZM_ASSERT(current_job == nullptr);
    current_job = this;
}

THostJob::~THostJob() {
    Stop();
    current_job = nullptr;
}

THostJob* THostJob::Current() {
    return current_job;
}

void THostJob::SetError(std::int32_t code, std::u16string text) {
    error_code_ = code;
    error_text_ = std::move(text);
}

bool THostJob::RunStep(std::int32_t action_index, std::int32_t step_number,
                       const std::u16string& step_text) {
    SetError(0, {});
    run_steps_.push_back({action_index, step_number, step_text});
    TCallParams params(step_text, task_id_, step_number);
    TLongBool result = kLongFalse;
    std::u16string exception_text;
    const bool returned = platform::CallCatchingHostExceptions(
        [&] { result = host_.plugin_info_->ActionsInfo->ExecAction(action_index, params.Get()); },
        exception_text);
    if (!returned) {
        SetError(0, exception_text);
    } else if (result == kLongFalse && error_text_.empty()) {
        // What the step was to do, with its values, often shows the reason.
        SetError(
            error_code_,
            kSilentFailure + ExpandJobText(host_.Describe(action_index, step_text), variables_));
    }
    return returned && result != kLongFalse;
}

void THostJob::Stop() {
    if (stopped_) {
        return;
    }
    stopped_ = true;
    for (const TRunStepRecord& step : run_steps_) {
        TCallParams params(step.text, task_id_, step.step_number);
        std::u16string ignored_text;  // a job's end has nobody left to tell
        static_cast<void>(platform::CallCatchingHostExceptions(
            [&] { host_.plugin_info_->ActionsInfo->JobStop(step.action_index, params.Get()); },
            ignored_text));
    }
}

}  // namespace zm::qvrun
