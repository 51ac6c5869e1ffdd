#pragma once

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <vector>

#include "engine/platform/module.h"
#include "plugin/AFTypes.h"
#include "plugin/uGraphicsDM.h"

/// A host for tests of the plug-in.
namespace zm::test {

/// The callbacks of the contract carry no object, so each host that lives at a time has a slot.
enum THostSlot : std::uint8_t { hsModule, hsLinked };

struct THostError {
    std::int32_t job_id = 0;
    std::int32_t code = 0;
    std::u16string text;
    friend bool operator==(const THostError&, const THostError&) = default;
};

struct THostLine {
    std::int32_t kind = 0;
    std::u16string text;
    friend bool operator==(const THostLine&, const THostLine&) = default;
};

/// Answers the plug-in's callbacks, accounts for every byte of its heap, and keeps what it was
/// told. Thread-safe, save for the settings made before a run.
class TTestHost {
public:
    explicit TTestHost(THostSlot slot);
    ~TTestHost();
    TTestHost(const TTestHost&) = delete;
    TTestHost& operator=(const TTestHost&) = delete;

    TAFAppInfo app_info{};
    std::u16string version = u"8.3";

    // Heap.
    void GetMemory(void** block, std::int32_t size_bytes);
    void FreeMemory(void** block, std::int32_t size_bytes);
    std::int64_t OutstandingBytes();
    std::int32_t OutstandingBlocks();
    /// Frees of unknown blocks or with another size than the block's.
    std::int32_t HeapFaults();
    /// The next allocation of this size or above finds no memory; 0 switches that off.
    std::int32_t refuse_from_bytes = 0;

    // Reports.
    std::vector<THostError> Errors();
    std::vector<THostLine> Lines();
    void ForgetReports();
    void AddError(THostError error);
    void AddLine(THostLine line);

    // Variables: "{name}" in a text. What `variables` lacks stays as it is.
    std::map<std::u16string, std::u16string> variables;
    /// Bytes that every call asks for beyond what the text takes, each call once more; makes a
    /// host that is never content.
    std::int32_t always_more_bytes = 0;
    std::vector<std::int32_t> expand_sizes;  ///< size word of each call of ExpandText
    void Expand(const char16_t* text, char16_t* buffer, std::int32_t* size_bytes,
                std::int32_t* status);
    std::u16string selected_variable;

private:
    std::u16string Expanded(std::u16string text) const;

    THostSlot slot_;
    std::mutex mutex_;
    std::map<void*, std::int32_t> blocks_;
    std::int32_t heap_faults_ = 0;
    std::vector<THostError> errors_;
    std::vector<THostLine> lines_;
};

/// One parameter record with its block on the host's heap, freed in the end.
class TTestStep {
public:
    TTestStep(TTestHost& host, std::u16string_view text, std::uint32_t task_id = 1);
    ~TTestStep();
    TTestStep(const TTestStep&) = delete;
    TTestStep& operator=(const TTestStep&) = delete;
    std::u16string Text() const { return static_cast<const char16_t*>(params.PPtr); }

    TAFActionParams params{};

private:
    TTestHost& host_;
};

/// Calls a plug-in through its record, as a host does.
class TPluginCaller {
public:
    TPluginCaller(TTestHost& host, TAFPluginInfo* info) : host_(host), info_(info) {}
    bool Exec(std::int32_t action, std::u16string_view text, std::uint32_t task_id = 1);
    std::u16string Describe(std::int32_t action, std::u16string_view text);
    void JobStop(std::int32_t action, std::uint32_t task_id = 1);
    TAFPluginInfo* Info() const { return info_; }
    TAFActionsInfo& Actions() const { return *info_->ActionsInfo; }

private:
    TTestHost& host_;
    TAFPluginInfo* info_;
};

/// The plug-in linked into the test program, with a host of its own; gone with the object.
class TLinkedPlugin {
public:
    TLinkedPlugin();
    ~TLinkedPlugin();

    TTestHost host{hsLinked};
    std::unique_ptr<TDM> data_module;
    std::unique_ptr<TPluginCaller> caller;
};

/// The built module, loaded and accepted once for the whole test program.
struct TLoadedModule {
    TTestHost host{hsModule};
    std::unique_ptr<platform::TLibrary> library;
    TInitQVPlugin entry = nullptr;
    std::unique_ptr<TPluginCaller> caller;  ///< nil when the module could not be loaded
};
TLoadedModule& LoadedModule();

}  // namespace zm::test
