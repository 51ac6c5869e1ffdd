#include "plugin/AFPlugin.h"

#include <algorithm>
#include <chrono>
#include <new>
#include <random>

#include "engine/foundation/zmassert.h"
#include "engine/platform/hostboundary.h"
#include "engine/platform/module.h"
#include "plugin/AFPlugin_p.h"

namespace zm {
namespace {

constexpr std::int32_t kLowestRandomID = 50;
constexpr std::int32_t kRandomIDLimit = 2147483547;  // exclusive, before the lowest is added
constexpr std::size_t kModulePathMaxLength = 10240;
constexpr std::intptr_t kMinFormScale = 100;
constexpr std::intptr_t kMaxFormScale = 250;

bool component_initialized = false;
TAFPlugin* plugin_instance = nullptr;

std::int32_t RandomID() {
    std::mt19937 generator(static_cast<std::mt19937::result_type>(
        std::chrono::system_clock::now().time_since_epoch().count()));
    std::uniform_int_distribution<std::int32_t> numbers(0, kRandomIDLimit - 1);
    return numbers(generator) + kLowestRandomID;
}

const TAFAppInfo& Host() {
    if (plugin_instance == nullptr) {
        throw EPluginException("The plug-in has not been initialised by a host");
    }
    return plugin_instance->GetAppInfo();
}

template <typename TRecord>
TRecord* NewHostRecord() {
    void* block = nullptr;
    HostGetMemory(&block, sizeof(TRecord));
    return new (block) TRecord{};
}

/// The records are the host's: given back by its own function, whatever component is current.
template <typename TRecord>
void FreeHostRecords(const TAFAppInfo& host, std::vector<TRecord*>& records) {
    for (TRecord* record : records) {
        void* block = record;
        host.QVFreeMemory(&block, sizeof(TRecord));
    }
    records.clear();
}

std::intptr_t AskHost(const TAFPlugin& plugin, THostQuery query) {
    return platform::SendHostMessage(plugin.GetAppInfo().WHandle, kHostQueryMessage, query, 0);
}

std::u16string AskHostText(const TAFPlugin& plugin, THostQuery query) {
    // A message's answer is a number; the contract has it stand for an address here.
    // NOLINTNEXTLINE(performance-no-int-to-ptr)
    const auto* text = reinterpret_cast<const char16_t*>(AskHost(plugin, query));
    return text == nullptr ? std::u16string() : std::u16string(text);
}

}  // namespace

TAFPlugin* PluginInstance() {
    return plugin_instance;
}

void AllowAnotherInitializeForTests() {
    ZM_ASSERT(plugin_instance == nullptr);
    component_initialized = false;
}

void TAFItem::SetName(const std::u16string& name) {
    if (!name.empty()) {
        FName = name;
    }
}

TAFPlugin::TAFPlugin()
    : FActions(this), FEvents(this), FID(RandomID()), FDescription(u"New plugin for Quorvel") {}

TAFPlugin::~TAFPlugin() {
    FreeHostRecords(FAppInfo, FListActionInfo);
    FreeHostRecords(FAppInfo, FListEventInfo);
    if (plugin_instance == this) {
        plugin_instance = nullptr;
    }
}

void TAFPlugin::SetDescription(const std::u16string& description) {
    if (!description.empty()) {
        FDescription = description;
    }
}

TAFPluginInfo* TAFPlugin::Initialize(const TAFAppInfo& app_info) {
    if (component_initialized) {
        throw EPluginException("Project can have only one component TAFPlugin");
    }
    FModuleFileName = platform::ModulePathOf(reinterpret_cast<const void*>(&PluginInstance));
    FModuleFileName.resize(std::min(FModuleFileName.size(), kModulePathMaxLength));
    plugin_instance = this;
    FAppInfo = app_info;
    FillPluginInfo();
    FillActions();
    FillEvents();
    component_initialized = true;
    return &FPluginInfo;
}

void TAFPlugin::FillPluginInfo() {
    FPluginInfo.ID = FID;
    FPluginInfo.Icon = FIcon.GetHandle();
    FPluginInfo.Descr = FDescription.c_str();
    SetPluginThunks(*this, FPluginInfo);
}

void TAFPlugin::FillActions() {
    FListActionInfo.reserve(static_cast<std::size_t>(FActions.Count()));
    for (std::int32_t index = 0; index < FActions.Count(); ++index) {
        TAction& action = *FActions.GetItem(index);
        auto* info = NewHostRecord<TAFActionInfo>();
        FListActionInfo.push_back(info);
        info->Name = action.GetName().c_str();
        info->Icon = action.GetIcon().GetHandle();
        info->AllowNTService = action.AllowNTService ? kLongTrue : kLongFalse;
        info->Indent = action.Indent > 0 ? 1 : action.Indent < 0 ? -1 : 0;
        info->ActionType = action.ActionType;
        info->ActionID = action.GetID().c_str();
        info->ScriptFunctionName = action.ScriptFunctionName.c_str();
    }
    if (FActions.Count() > 0) {
        FActionsInfo.ActionsCount = FActions.Count();
        SetActionThunks(FActionsInfo);
        FPluginInfo.IsActions = kLongTrue;
        FPluginInfo.ActionsInfo = &FActionsInfo;
    }
}

void TAFPlugin::FillEvents() {
    FListEventInfo.reserve(static_cast<std::size_t>(FEvents.Count()));
    for (std::int32_t index = 0; index < FEvents.Count(); ++index) {
        TEvent& event = *FEvents.GetItem(index);
        auto* info = NewHostRecord<TAFEventInfo>();
        FListEventInfo.push_back(info);
        info->Name = event.GetName().c_str();
        info->Icon = event.GetIcon().GetHandle();
        info->AllowNTService = event.AllowNTService ? kLongTrue : kLongFalse;
        info->EventID = event.GetID().c_str();
    }
    if (FEvents.Count() > 0) {
        FEventsInfo.EventsCount = FEvents.Count();
        SetEventThunks(FEventsInfo);
        FPluginInfo.IsEvents = kLongTrue;
        FPluginInfo.EventsInfo = &FEventsInfo;
    }
}

std::int32_t TAFPlugin::DefaultScale() const {
    const std::intptr_t answer = AskHost(*this, hqFormScale);
    return static_cast<std::int32_t>(
        answer < kMinFormScale || answer > kMaxFormScale ? kMinFormScale : answer);
}

void HostGetMemory(void** block, std::int32_t size_bytes) {
    Host().QVGetMemory(block, size_bytes);
    if (*block == nullptr) {
        throw std::bad_alloc();
    }
}

void HostFreeMemory(void** block, std::int32_t size_bytes) {
    Host().QVFreeMemory(block, size_bytes);
}

void HostExpandText(const char16_t* text, char16_t* buffer, std::int32_t* size_bytes,
                    std::int32_t* status) {
    Host().ExpandText(text, buffer, size_bytes, status);
}

void HostSelectVar(char16_t* buffer, std::int32_t max_length) {
    Host().SelectVar(buffer, max_length);
}

void HostInfoOut(std::int32_t kind, const char16_t* text) {
    Host().InfoOut(kind, text);
}

void HostSetLastError(std::int32_t job_id, std::int32_t code, const char16_t* text) {
    if (Host().SetLastError != nullptr) {
        Host().SetLastError(job_id, code, text);
    }
}

std::u16string IncludeTrailingSlash(const std::u16string& text) {
    if (text.empty() || text.back() == u'\\') {
        return text;
    }
    const bool is_drive_letter = text.size() == 1 && ((text[0] >= u'A' && text[0] <= u'Z') ||
                                                      (text[0] >= u'a' && text[0] <= u'z'));
    return text + (is_drive_letter ? u":\\" : u"\\");
}

std::u16string RemoveChar(const std::u16string& text, char16_t character) {
    std::u16string result = text;
    std::erase(result, character);
    return result;
}

void ReadPluginSettings(TQVPluginSettings& settings, const TAFPlugin& plugin) {
    settings.RegRoot = AskHost(plugin, hqRegRoot);
    settings.RegKey = AskHostText(plugin, hqRegKey);
    if (!settings.RegKey.empty()) {
        settings.RegKey =
            IncludeTrailingSlash(settings.RegKey) + RemoveChar(plugin.GetDescription(), u' ');
    }
    settings.AppPath = AskHostText(plugin, hqAppPath);
}

}  // namespace zm
