#include "tests/plugin/testhost.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>

#include "engine/foundation/zmstrings.h"
#include "plugin/AFPlugin_p.h"

namespace zm::test {
namespace {

TTestHost* hosts[2] = {};

template <THostSlot Slot>
struct TCallbacks {
    static void ZM_STDCALL InfoOut(std::int32_t kind, const char16_t* text) {
        hosts[Slot]->AddLine({kind, text});
    }
    static void ZM_STDCALL GetMemory(void** block, std::int32_t size_bytes) {
        hosts[Slot]->GetMemory(block, size_bytes);
    }
    static void ZM_STDCALL FreeMemory(void** block, std::int32_t size_bytes) {
        hosts[Slot]->FreeMemory(block, size_bytes);
    }
    static void ZM_STDCALL ExpandText(const char16_t* text, char16_t* buffer,
                                      std::int32_t* size_bytes, std::int32_t* status) {
        hosts[Slot]->Expand(text, buffer, size_bytes, status);
    }
    static void ZM_STDCALL SelectVar(char16_t* buffer, std::int32_t max_length) {
        const std::u16string& name = hosts[Slot]->selected_variable;
        const auto length = std::min(name.size(), static_cast<std::size_t>(max_length));
        std::copy_n(name.data(), length, buffer);
        buffer[length] = u'\0';
    }
    static void ZM_STDCALL SetLastError(std::int32_t job_id, std::int32_t code,
                                        const char16_t* text) {
        hosts[Slot]->AddError({job_id, code, text});
    }

    static void Fill(TAFAppInfo& info) {
        info.InfoOut = &InfoOut;
        info.QVGetMemory = &GetMemory;
        info.QVFreeMemory = &FreeMemory;
        info.ExpandText = &ExpandText;
        info.SelectVar = &SelectVar;
        info.SetLastError = &SetLastError;
    }
};

}  // namespace

TTestHost::TTestHost(THostSlot slot) : slot_(slot) {
    EXPECT_EQ(hosts[slot], nullptr) << "one host per slot";
    hosts[slot] = this;
    app_info.Ver = version.c_str();
    slot == hsModule ? TCallbacks<hsModule>::Fill(app_info) : TCallbacks<hsLinked>::Fill(app_info);
}

TTestHost::~TTestHost() {
    EXPECT_EQ(OutstandingBytes(), 0) << "the plug-in kept memory of the host";
    EXPECT_EQ(HeapFaults(), 0);
    for (const auto& [block, size] : blocks_) {
        std::free(block);
    }
    hosts[slot_] = nullptr;
}

void TTestHost::GetMemory(void** block, std::int32_t size_bytes) {
    const std::lock_guard lock(mutex_);
    const bool refused = refuse_from_bytes != 0 && size_bytes >= refuse_from_bytes;
    *block = refused ? nullptr : std::malloc(static_cast<std::size_t>(size_bytes));
    if (*block != nullptr) {
        std::memset(*block, 0xCD, static_cast<std::size_t>(size_bytes));
        blocks_[*block] = size_bytes;
    }
}

void TTestHost::FreeMemory(void** block, std::int32_t size_bytes) {
    const std::lock_guard lock(mutex_);
    const auto found = blocks_.find(*block);
    if (found == blocks_.end() || found->second != size_bytes) {
        ++heap_faults_;
    }
    if (found != blocks_.end()) {
        std::free(found->first);
        blocks_.erase(found);
    }
    *block = nullptr;
}

std::int64_t TTestHost::OutstandingBytes() {
    const std::lock_guard lock(mutex_);
    std::int64_t bytes = 0;
    for (const auto& [block, size] : blocks_) {
        bytes += size;
    }
    return bytes;
}

std::int32_t TTestHost::OutstandingBlocks() {
    const std::lock_guard lock(mutex_);
    return static_cast<std::int32_t>(blocks_.size());
}

std::int32_t TTestHost::HeapFaults() {
    const std::lock_guard lock(mutex_);
    return heap_faults_;
}

std::vector<THostError> TTestHost::Errors() {
    const std::lock_guard lock(mutex_);
    return errors_;
}

std::vector<THostLine> TTestHost::Lines() {
    const std::lock_guard lock(mutex_);
    return lines_;
}

void TTestHost::ForgetReports() {
    const std::lock_guard lock(mutex_);
    errors_.clear();
    lines_.clear();
}

void TTestHost::AddError(THostError error) {
    const std::lock_guard lock(mutex_);
    errors_.push_back(std::move(error));
}

void TTestHost::AddLine(THostLine line) {
    const std::lock_guard lock(mutex_);
    lines_.push_back(std::move(line));
}

std::u16string TTestHost::Expanded(std::u16string text) const {
    for (const auto& [name, value] : variables) {
        const std::size_t found = text.find(u"{" + name + u"}");
        if (found != std::u16string::npos) {
            text.replace(found, name.size() + 2, value);
        }
    }
    return text;
}

void TTestHost::Expand(const char16_t* text, char16_t* buffer, std::int32_t* size_bytes,
                       std::int32_t* status) {
    const std::lock_guard lock(mutex_);
    expand_sizes.push_back(*size_bytes);
    const std::u16string expanded = Expanded(text);
    const auto room = static_cast<std::size_t>(*size_bytes) / sizeof(char16_t);
    // A cut text fills the buffer to its last character and has no terminator.
    std::copy_n(expanded.c_str(), std::min(room, expanded.size() + 1), buffer);
    const auto needed = static_cast<std::int32_t>((expanded.size() + 1) * sizeof(char16_t));
    *status = needed > *size_bytes || always_more_bytes != 0 ? 1 : 0;
    if (*status != 0) {
        const bool second_call = *size_bytes != expand_sizes.front();
        *size_bytes = needed + always_more_bytes * static_cast<std::int32_t>(expand_sizes.size());
        if (second_call) {
            blocks_[buffer] = *size_bytes;  // the size that the block must come back with
        }
    }
}

TTestStep::TTestStep(TTestHost& host, std::u16string_view text, std::uint32_t task_id)
    : host_(host) {
    params.Size = static_cast<std::int32_t>((text.size() + 1) * sizeof(char16_t));
    params.TaskID = task_id;
    params.StepNum = 7;
    host_.GetMemory(&params.PPtr, params.Size);
    auto* block = static_cast<char16_t*>(params.PPtr);
    std::copy_n(text.data(), text.size(), block);
    block[text.size()] = u'\0';
}

TTestStep::~TTestStep() {
    if (params.PPtr != nullptr) {
        host_.FreeMemory(&params.PPtr, params.Size);
    }
}

bool TPluginCaller::Exec(std::int32_t action, std::u16string_view text, std::uint32_t task_id) {
    TTestStep step(host_, text, task_id);
    const TLongBool result = Actions().ExecAction(action, &step.params);
    EXPECT_TRUE(result == kLongFalse || result == kLongTrue) << result;
    return result != kLongFalse;
}

std::u16string TPluginCaller::Describe(std::int32_t action, std::u16string_view text) {
    TTestStep step(host_, text);
    // A guard behind the buffer that the contract promises.
    std::vector<char16_t> buffer(kDescriptionBufferLength + 1, u'\x7E7E');
    Actions().ActionDescr(action, &step.params, buffer.data());
    EXPECT_EQ(buffer.back(), u'\x7E7E') << "written past the buffer";
    return std::u16string(buffer.begin(), std::find(buffer.begin(), buffer.end(), u'\0'));
}

void TPluginCaller::JobStop(std::int32_t action, std::uint32_t task_id) {
    TTestStep step(host_, u"", task_id);
    Actions().JobStop(action, &step.params);
}

TLinkedPlugin::TLinkedPlugin() : data_module(std::make_unique<TDM>()) {
    AllowAnotherInitializeForTests();
    caller = std::make_unique<TPluginCaller>(host, data_module->Init(host.app_info));
}

TLinkedPlugin::~TLinkedPlugin() {
    data_module.reset();
    AllowAnotherInitializeForTests();
}

TLoadedModule& LoadedModule() {
    // Lives to the end of the process: the module gives its records back when it goes.
    static TLoadedModule* const loaded = [] {
        auto* module = new TLoadedModule;
        const std::u16string path = Utf16FromUtf8(ZM_MODULE_DIR "/Graphics.qvp");
        std::string error_text;
        module->library = platform::LoadLibraryFile(path, error_text);
        EXPECT_NE(module->library, nullptr) << error_text;
        if (module->library != nullptr) {
            module->entry =
                reinterpret_cast<TInitQVPlugin>(module->library->FindSymbol(kInitQVPluginName));
            module->caller = std::make_unique<TPluginCaller>(module->host,
                                                             module->entry(&module->host.app_info));
        }
        return module;
    }();
    return *loaded;
}

}  // namespace zm::test
