#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "engine/foundation/zmstrings.h"
#include "plugin/AFTypes.h"
#include "plugin/uIcons.h"

/// The component model over the host contract: a plug-in is declared as a TAFPlugin with actions
/// and events; Initialize turns the declaration into the host's records. After Initialize the
/// declaration is read only, and the functions of the records may run on any thread.
namespace zm {

class TAction;
class TAFPlugin;
class TEvent;

/// Misuse of the component or of its parameters; `what()` is the message in UTF-8.
class EPluginException : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

// Handlers. `sender` is the item that the host's index names. They may raise: exceptions pass to
// the host.
using TExecAction = std::function<TLongBool(TAction* sender, TAFActionParams& params)>;
using TConfigAction = TExecAction;
/// `Descr` comes in with the action's name.
using TActionDescr =
    std::function<void(TAction* sender, TAFActionParams& params, std::u16string& Descr)>;
using TDeleteAction = std::function<void(TAction* sender, TAFActionParams& params)>;
using TConfigEvent = std::function<TLongBool(TEvent* sender, TAFEventParams& params)>;
using TStartEvent = TConfigEvent;
using TStopEvent = std::function<void(TEvent* sender, TAFEventParams& params)>;
using TEventDescr =
    std::function<void(TEvent* sender, TAFEventParams& params, std::u16string& Descr)>;
using TPluginConfig = std::function<void()>;
using TAbout = std::function<void()>;
using TShutdownPlugin = std::function<void()>;

/// What actions and events have in common. The texts must not change after Initialize: the
/// host's records point at them.
class TAFItem {
public:
    explicit TAFItem(std::u16string name) : FName(std::move(name)) {}
    TAFItem(const TAFItem&) = delete;
    TAFItem& operator=(const TAFItem&) = delete;

    const std::u16string& GetName() const { return FName; }
    /// An empty name is ignored.
    void SetName(const std::u16string& name);
    const std::u16string& GetDisplayName() const { return FName; }
    /// ActionID or EventID; kept in upper case.
    const std::u16string& GetID() const { return FID; }
    void SetID(std::u16string_view id) { FID = AsciiUpper(id); }
    TIcon& GetIcon() { return FIcon; }
    /// Place in the collection, from 0.
    std::int32_t GetIndex() const { return index_; }

    bool AllowNTService = true;

private:
    template <typename TItem>
    friend class TAFCollection;

    TIcon FIcon;
    std::u16string FName;
    std::u16string FID;
    std::int32_t index_ = 0;
};

class TAction : public TAFItem {
public:
    TAction() : TAFItem(u"New Action") {}

    TExecAction OnExecAction;
    TConfigAction OnConfigAction;
    TActionDescr OnActionDescr;
    TDeleteAction OnActionDelete;
    TDeleteAction OnJobStop;
    std::int32_t Indent = 0;  ///< the host gets its sign
    TAFActionType ActionType = atSimple;
    std::u16string ScriptFunctionName;
};

class TEvent : public TAFItem {
public:
    TEvent() : TAFItem(u"New Event") {}

    TConfigEvent OnConfigEvent;
    TStartEvent OnStartEvent;
    TStopEvent OnStopEvent;
    TEventDescr OnEventDescr;
    TStopEvent OnDeleteEvent;
    TStopEvent OnDuplicateEvent;
};

/// Ordered items with their owner; owns the items.
template <typename TItem>
class TAFCollection {
public:
    explicit TAFCollection(TAFPlugin* owner) : owner_(owner) {}
    TAFPlugin* GetOwner() const { return owner_; }
    TItem& Add() {
        items_.push_back(std::make_unique<TItem>());
        items_.back()->index_ = Count() - 1;
        return *items_.back();
    }
    std::int32_t Count() const { return static_cast<std::int32_t>(items_.size()); }
    /// The item, or nil for an index outside.
    TItem* GetItem(std::int32_t index) const {
        return index < 0 || index >= Count() ? nullptr
                                             : items_[static_cast<std::size_t>(index)].get();
    }

private:
    TAFPlugin* owner_;
    std::vector<std::unique_ptr<TItem>> items_;
};

using TActions = TAFCollection<TAction>;
using TEvents = TAFCollection<TEvent>;

/// The component. A process can initialise one: the functions of the records have no object
/// argument and reach it through a process-wide reference.
class TAFPlugin {
public:
    /// Has a random ID from 50 up and the description "New plugin for Quorvel".
    TAFPlugin();
    /// Gives the records back to the host's heap; the records' functions then do nothing.
    ~TAFPlugin();
    TAFPlugin(const TAFPlugin&) = delete;
    TAFPlugin& operator=(const TAFPlugin&) = delete;

    /// Copies the host's record, builds the plug-in's and returns its address, valid as long as
    /// the object. Raises EPluginException when a component of this process already did.
    TAFPluginInfo* Initialize(const TAFAppInfo& app_info);

    TActions& GetActions() { return FActions; }
    TEvents& GetEvents() { return FEvents; }
    TIcon& GetIcon() { return FIcon; }
    std::int32_t GetID() const { return FID; }
    void SetID(std::int32_t id) { FID = id; }
    const std::u16string& GetDescription() const { return FDescription; }
    /// An empty text is ignored.
    void SetDescription(const std::u16string& description);
    /// Path of the file that holds the plug-in; known after Initialize.
    const std::u16string& GetModuleFileName() const { return FModuleFileName; }
    /// The host's record; zeroes before Initialize.
    const TAFAppInfo& GetAppInfo() const { return FAppInfo; }
    /// The items' records, in order; empty before Initialize.
    const std::vector<TAFActionInfo*>& GetActionRecords() const { return FListActionInfo; }
    const std::vector<TAFEventInfo*>& GetEventRecords() const { return FListEventInfo; }
    /// The host's scale of its forms in percent; 100 when its answer is not from 100 to 250.
    std::int32_t DefaultScale() const;

    TPluginConfig OnPluginConfig;
    TAbout OnAbout;
    TShutdownPlugin OnShutdownPlugin;

private:
    void FillPluginInfo();
    void FillActions();
    void FillEvents();

    TAFAppInfo FAppInfo{};
    TActions FActions;
    TEvents FEvents;
    TIcon FIcon;
    std::int32_t FID = 0;
    std::u16string FDescription;
    TAFPluginInfo FPluginInfo{};
    TAFActionsInfo FActionsInfo{};
    TAFEventsInfo FEventsInfo{};
    std::vector<TAFActionInfo*> FListActionInfo;
    std::vector<TAFEventInfo*> FListEventInfo;
    std::u16string FModuleFileName;
};

// The host's services through the process-wide component. They raise EPluginException when
// none is initialised.

/// Allocates a block of the host's heap; raises std::bad_alloc when the host has none.
void HostGetMemory(void** block, std::int32_t size_bytes);
/// Frees a block of that heap; `size_bytes` is the size that it was allocated with.
void HostFreeMemory(void** block, std::int32_t size_bytes);
void HostExpandText(const char16_t* text, char16_t* buffer, std::int32_t* size_bytes,
                    std::int32_t* status);
void HostSelectVar(char16_t* buffer, std::int32_t max_length);
void HostInfoOut(std::int32_t kind, const char16_t* text);
/// Does nothing with a host that has no SetLastError.
void HostSetLastError(std::int32_t job_id, std::int32_t code, const char16_t* text);

/// Messages to the host's main window; the answers are addresses or numbers.
inline constexpr std::uint32_t kHostQueryMessage = 24601;
enum THostQuery : std::uint8_t {
    hqAppPath = 0,
    hqRegRoot = 4,
    hqRegKey = 7,
    hqFormScale = 9,
};

/// What the host's window tells the plug-in at start; not on the wire.
struct TQVPluginSettings {
    std::intptr_t RegRoot = 0;  ///< registry root handle
    std::u16string RegKey;      ///< the host's key and the plug-in's own part; empty if unknown
    std::u16string AppPath;
};

/// Asks the host; a nil window handle leaves everything empty.
void ReadPluginSettings(TQVPluginSettings& settings, const TAFPlugin& plugin);

/// Adds a backslash unless the text is empty or ends in one; a lone drive letter gets ":\".
std::u16string IncludeTrailingSlash(const std::u16string& text);
/// The text without any occurrence of a character.
std::u16string RemoveChar(const std::u16string& text, char16_t character);

}  // namespace zm
