// The functions that the host's records carry. Each finds the component and the item, and runs
// the item's handler inside the guard that turns our exceptions into ones that any host can
// catch. An index outside the collection, a nil parameter record and a component that has ended
// run nothing.

#include <algorithm>
#include <functional>

#include "engine/platform/hostboundary.h"
#include "plugin/AFPlugin_p.h"

namespace zm {
namespace {

constexpr std::size_t kMaxDescriptionLength = 256;
constexpr std::size_t kCutDescriptionLength = 253;
static_assert(kMaxDescriptionLength + 1 == kDescriptionBufferLength);

template <typename TBody>
void Guarded(TBody body) {
    platform::GuardHostCall(std::ref(body));
}

TAction* FindItem(const TAFActionParams*, std::int32_t index) {
    TAFPlugin* plugin = PluginInstance();
    return plugin == nullptr ? nullptr : plugin->GetActions().GetItem(index);
}

TEvent* FindItem(const TAFEventParams*, std::int32_t index) {
    TAFPlugin* plugin = PluginInstance();
    return plugin == nullptr ? nullptr : plugin->GetEvents().GetItem(index);
}

/// Runs a handler that answers; 0 without one.
template <typename TItem, typename TParams>
TLongBool RunAnswering(std::function<TLongBool(TItem*, TParams&)> TItem::*handler,
                       std::int32_t index, TParams* params) {
    TLongBool result = kLongFalse;
    Guarded([&] {
        TItem* item = FindItem(params, index);
        if (item != nullptr && params != nullptr && item->*handler) {
            result = (item->*handler)(item, *params);
        }
    });
    return result;
}

/// Runs a handler without an answer, when there is one.
template <typename TItem, typename TParams>
void RunTelling(std::function<void(TItem*, TParams&)> TItem::*handler, std::int32_t index,
                TParams* params) {
    Guarded([&] {
        TItem* item = FindItem(params, index);
        if (item != nullptr && params != nullptr && item->*handler) {
            (item->*handler)(item, *params);
        }
    });
}

void CopyDescription(std::u16string text, char16_t* buffer) {
    if (text.size() > kMaxDescriptionLength) {
        text.resize(kCutDescriptionLength);
        text += u"...";
    }
    std::copy_n(text.c_str(), text.size() + 1, buffer);
}

template <typename TItem, typename TParams>
void RunDescribing(std::function<void(TItem*, TParams&, std::u16string&)> TItem::*handler,
                   std::int32_t index, TParams* params, char16_t* buffer) {
    if (buffer == nullptr) {
        return;
    }
    *buffer = u'\0';
    Guarded([&] {
        TItem* item = FindItem(params, index);
        if (item == nullptr) {
            return;
        }
        std::u16string text = item->GetName();
        if (params != nullptr && item->*handler) {
            (item->*handler)(item, *params, text);
        }
        CopyDescription(std::move(text), buffer);
    });
}

/// Record of an item as the component keeps it.
template <typename TRecord>
TRecord* RecordAt(const std::vector<TRecord*>& records, std::int32_t index) {
    return index < 0 || static_cast<std::size_t>(index) >= records.size()
               ? nullptr
               : records[static_cast<std::size_t>(index)];
}

TAFActionInfo* ZM_STDCALL GetActionInfoThunk(std::int32_t index) {
    TAFPlugin* plugin = PluginInstance();
    return plugin == nullptr ? nullptr : RecordAt(plugin->GetActionRecords(), index);
}

TLongBool ZM_STDCALL ConfigActionThunk(std::int32_t index, TAFActionParams* params) {
    return RunAnswering(&TAction::OnConfigAction, index, params);
}

TLongBool ZM_STDCALL ExecActionThunk(std::int32_t index, TAFActionParams* params) {
    return RunAnswering(&TAction::OnExecAction, index, params);
}

void ZM_STDCALL ActionDescrThunk(std::int32_t index, TAFActionParams* params, char16_t* buffer) {
    RunDescribing(&TAction::OnActionDescr, index, params, buffer);
}

void ZM_STDCALL DeleteActionThunk(std::int32_t index, TAFActionParams* params) {
    RunTelling(&TAction::OnActionDelete, index, params);
}

void ZM_STDCALL JobStopThunk(std::int32_t index, TAFActionParams* params) {
    RunTelling(&TAction::OnJobStop, index, params);
}

TAFEventInfo* ZM_STDCALL GetEventInfoThunk(std::int32_t index) {
    TAFPlugin* plugin = PluginInstance();
    return plugin == nullptr ? nullptr : RecordAt(plugin->GetEventRecords(), index);
}

TLongBool ZM_STDCALL ConfigEventThunk(std::int32_t index, TAFEventParams* params) {
    return RunAnswering(&TEvent::OnConfigEvent, index, params);
}

TLongBool ZM_STDCALL StartEventThunk(std::int32_t index, TAFEventParams* params) {
    return RunAnswering(&TEvent::OnStartEvent, index, params);
}

void ZM_STDCALL StopEventThunk(std::int32_t index, TAFEventParams* params) {
    RunTelling(&TEvent::OnStopEvent, index, params);
}

void ZM_STDCALL EventDescrThunk(std::int32_t index, TAFEventParams* params, char16_t* buffer) {
    RunDescribing(&TEvent::OnEventDescr, index, params, buffer);
}

void ZM_STDCALL DeleteEventThunk(std::int32_t index, TAFEventParams* params) {
    RunTelling(&TEvent::OnDeleteEvent, index, params);
}

void ZM_STDCALL DuplicateEventThunk(std::int32_t index, TAFEventParams* params) {
    RunTelling(&TEvent::OnDuplicateEvent, index, params);
}

void RunSimple(std::function<void()> TAFPlugin::*handler) {
    Guarded([&] {
        TAFPlugin* plugin = PluginInstance();
        if (plugin != nullptr && plugin->*handler) {
            (plugin->*handler)();
        }
    });
}

void ZM_STDCALL PluginConfigThunk() {
    RunSimple(&TAFPlugin::OnPluginConfig);
}

void ZM_STDCALL AboutThunk() {
    RunSimple(&TAFPlugin::OnAbout);
}

void ZM_STDCALL ShutdownPluginThunk() {
    RunSimple(&TAFPlugin::OnShutdownPlugin);
}

}  // namespace

void SetActionThunks(TAFActionsInfo& info) {
    info.GetActionInfo = &GetActionInfoThunk;
    info.ConfigAction = &ConfigActionThunk;
    info.ExecAction = &ExecActionThunk;
    info.ActionDescr = &ActionDescrThunk;
    info.DeleteAction = &DeleteActionThunk;
    info.JobStop = &JobStopThunk;
}

void SetEventThunks(TAFEventsInfo& info) {
    info.GetEventInfo = &GetEventInfoThunk;
    info.ConfigEvent = &ConfigEventThunk;
    info.StartEvent = &StartEventThunk;
    info.StopEvent = &StopEventThunk;
    info.EventDescr = &EventDescrThunk;
    info.DeleteEvent = &DeleteEventThunk;
    info.DuplicateEvent = &DuplicateEventThunk;
}

void SetPluginThunks(const TAFPlugin& plugin, TAFPluginInfo& info) {
    info.PluginConfig = plugin.OnPluginConfig ? &PluginConfigThunk : nullptr;
    info.About = plugin.OnAbout ? &AboutThunk : nullptr;
    info.ShutdownPlugin = plugin.OnShutdownPlugin ? &ShutdownPluginThunk : nullptr;
}

}  // namespace zm
