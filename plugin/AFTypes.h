#pragma once

#include <cstddef>
#include <cstdint>

#include "engine/platform/callconv.h"

/// Records and callbacks of the host contract.
///
/// The host and the plug-in hand each other the addresses of these records, so their layouts are
/// a wire format. On 32 bits every pointer and function pointer has four bytes and the fields
/// stand exactly at the offsets asserted below. On 64 bits the same fields follow in the same
/// order with native pointers and natural alignment; integers, LongBools and reserved fields keep
/// 32 bits. Functions have the platform's standard call convention (ZM_STDCALL). Texts are
/// zero-terminated UTF-16 in native byte order. Field names are the contract's own.
namespace zm {

/// 32 bits: 0 is false, everything else true; we give out kLongTrue, all bits set.
using TLongBool = std::int32_t;
inline constexpr TLongBool kLongFalse = 0;
inline constexpr TLongBool kLongTrue = -1;

struct TAFActionInfo;
struct TAFActionParams;
struct TAFEventInfo;
struct TAFEventParams;

// Callbacks of the host that the plug-in calls.

/// Writes a line to the host's log. `kind` 2 is an error.
using TAFInfoOut = void(ZM_STDCALL*)(std::int32_t kind, const char16_t* text);
/// Allocates into `*block`, or frees `*block`; `size_bytes` is the size of the block both times.
using TAFGetFreeMem = void(ZM_STDCALL*)(void** block, std::int32_t size_bytes);
/// Expands variables of `text` into `buffer`, which has `*size_bytes` bytes. When that is too
/// little, `*status` becomes non-zero and `*size_bytes` what is needed.
using TAFExpandText = void(ZM_STDCALL*)(const char16_t* text, char16_t* buffer,
                                        std::int32_t* size_bytes, std::int32_t* status);
/// Lets the user pick a variable; `max_length` counts characters.
using TAFSelectVar = void(ZM_STDCALL*)(char16_t* buffer, std::int32_t max_length);
/// Sets the last error of the job's present step.
using TQVSetLastError = void(ZM_STDCALL*)(std::int32_t job_id, std::int32_t code,
                                          const char16_t* text);

// Callbacks of the host that the plug-in never calls. Their arguments are the host's business;
// the fields only have to keep their place.
using TAFUncalledProc = void(ZM_STDCALL*)();
using TAFJobsEnum = TAFUncalledProc;
using TAFJobRunProc = TAFUncalledProc;
using TAFGetCurrentJobID = TAFUncalledProc;
using TAFJobStopProc = TAFUncalledProc;
using TAFJobProc = TAFUncalledProc;
using TAFAddMenuItem = TAFUncalledProc;
using TAFRemoveMenuItem = TAFUncalledProc;
using TAFAddVar = TAFUncalledProc;
using TAFUserVarProc = TAFUncalledProc;
using TAFPluinAbout = TAFUncalledProc;  // the contract's own spelling
using TAFJobsEnumENV = TAFUncalledProc;
using TQVSetRuntimeTag = TAFUncalledProc;
using TQVGetRuntimeTag = TAFUncalledProc;
using TQVEnumActions = TAFUncalledProc;
using TQVGetNextStep = TAFUncalledProc;
using TQVSetNextStep = TAFUncalledProc;
using TQVGetPrivateVariable = TAFUncalledProc;
using TQVSetPrivateVariable = TAFUncalledProc;

/// A call without arguments, in both directions.
using TAFSimpleProc = void(ZM_STDCALL*)();

// Functions that the plug-in gives to the host. `index` is the number of the action or event,
// from 0.

/// Address of the item's record, owned by the plug-in and valid while it is loaded.
using TAFGetActionInfo = TAFActionInfo*(ZM_STDCALL*)(std::int32_t index);
using TAFConfigAction = TLongBool(ZM_STDCALL*)(std::int32_t index, TAFActionParams* params);
using TAFExecAction = TLongBool(ZM_STDCALL*)(std::int32_t index, TAFActionParams* params);
/// `buffer` has room for kDescriptionBufferLength wide characters.
using TAFActionDescr = void(ZM_STDCALL*)(std::int32_t index, TAFActionParams* params,
                                         char16_t* buffer);
using TAFDeleteAction = void(ZM_STDCALL*)(std::int32_t index, TAFActionParams* params);
using TAFGetEventInfo = TAFEventInfo*(ZM_STDCALL*)(std::int32_t index);
using TAFConfigEvent = TLongBool(ZM_STDCALL*)(std::int32_t index, TAFEventParams* params);
using TAFStartEvent = TLongBool(ZM_STDCALL*)(std::int32_t index, TAFEventParams* params);
using TAFStopEvent = void(ZM_STDCALL*)(std::int32_t index, TAFEventParams* params);
using TAFEventDescr = void(ZM_STDCALL*)(std::int32_t index, TAFEventParams* params,
                                        char16_t* buffer);

/// Room of a description buffer in wide characters, the terminator included.
inline constexpr std::int32_t kDescriptionBufferLength = 257;

/// What an action means for the structure of a job; one byte in a component's item, an Integer
/// in the record.
enum TAFActionType : std::uint8_t {
    atSimple,
    atBeginLoop,
    atEndLoop,
    atElse,
    atEndIf,
    atIf,
    atElseIf,
};

/// Step management of the host; no part of the plug-in calls it.
struct TTaskManage {
    TQVEnumActions EnumActions;
    TQVGetNextStep GetNextStep;
    TQVSetNextStep SetNextStep;
    TQVGetNextStep GetCurrentStep;
    TQVGetPrivateVariable GetPrivateVariable;
    TQVSetPrivateVariable SetPrivateVariable;
};

/// Filled by the host, copied whole by the plug-in at initialisation.
struct TAFAppInfo {
    const char16_t* Ver;  ///< the host's version, dotted
    void* WHandle;        ///< main window, target of the host messages (see the host contract)
    TLongBool ServiceMode;
    TAFInfoOut InfoOut;
    TAFGetFreeMem QVGetMemory;
    TAFGetFreeMem QVFreeMemory;
    TAFJobsEnum JobsEnum;
    TAFJobRunProc JobRun;
    TAFGetCurrentJobID GetCurrentJobID;
    TAFJobStopProc JobStop;
    TAFJobProc JobTriggersOn;
    TAFJobProc JobTriggersOff;
    TAFAddMenuItem AddMenuItem;
    TAFRemoveMenuItem RemoveMenuItem;
    TAFExpandText ExpandText;
    TAFSelectVar SelectVar;
    TAFAddVar AddSysVar;
    TAFUserVarProc AddUserVar;
    TAFUserVarProc DelUserVar;
    TAFUserVarProc SetUserVar;
    TAFSimpleProc AppMinimize;
    TAFSimpleProc AppRestore;
    TAFSimpleProc AppClose;
    TAFSimpleProc AutomationOn;
    TAFSimpleProc AutomationOff;
    std::int32_t Reserved100;  ///< not read; named after its 32-bit offset, as the two below
    std::int32_t Reserved104;
    TAFPluinAbout PluginAbout;
    TTaskManage TaskManage;
    std::int32_t Reserved136;
    TQVSetLastError SetLastError;  ///< may be nil
    TAFJobsEnumENV JobsEnumENV;
    TQVSetRuntimeTag SetRuntimeTag;
    TQVGetRuntimeTag GetRuntimeTag;
};

/// One action, allocated on the host's heap. The texts belong to the plug-in.
struct TAFActionInfo {
    const char16_t* Name;
    void* Icon;
    TLongBool AllowNTService;
    std::int32_t Indent;      ///< -1, 0 or 1
    std::int32_t ActionType;  ///< TAFActionType
    const char16_t* ActionID;
    const char16_t* ScriptFunctionName;
};

/// One call for a step.
struct TAFActionParams {
    std::int32_t Size;     ///< bytes of the text at PPtr, its terminator included
    void* PPtr;            ///< key=value lines, zero-terminated; a block of the host's heap or nil
    std::uint32_t TaskID;  ///< the running job
    std::int32_t StepNum;
    TLongBool IsRemote;
};

struct TAFActionsInfo {
    std::int32_t ActionsCount;
    TAFGetActionInfo GetActionInfo;
    TAFConfigAction ConfigAction;
    TAFExecAction ExecAction;
    TAFActionDescr ActionDescr;
    TAFDeleteAction DeleteAction;
    TAFDeleteAction JobStop;
};

/// One event, allocated on the host's heap.
struct TAFEventInfo {
    const char16_t* Name;
    void* Icon;
    TLongBool AllowNTService;
    const char16_t* EventID;
};

/// One call for a triggering event.
struct TAFEventParams {
    std::int32_t JobID;
    std::int32_t Size;  ///< as TAFActionParams::Size
    void* PPtr;
    std::uint32_t UniqueID;
    TLongBool IsRemote;
};

struct TAFEventsInfo {
    std::int32_t EventsCount;
    TAFGetEventInfo GetEventInfo;
    TAFConfigEvent ConfigEvent;
    TAFStartEvent StartEvent;
    TAFStopEvent StopEvent;
    TAFEventDescr EventDescr;
    TAFStopEvent DeleteEvent;
    TAFStopEvent DuplicateEvent;
};

/// Filled by the plug-in, which keeps it alive.
struct TAFPluginInfo {
    std::int32_t ID;
    void* Icon;
    const char16_t* Descr;
    TAFSimpleProc PluginConfig;  ///< nil without a handler, as the two below
    TAFSimpleProc About;
    TAFSimpleProc ShutdownPlugin;
    TLongBool IsActions;
    TAFActionsInfo* ActionsInfo;  ///< nil without actions
    TLongBool IsEvents;
    TAFEventsInfo* EventsInfo;  ///< nil without events
};

/// Belongs to the host's step enumeration; the plug-in builds none.
struct TQVActionPassport {
    std::int32_t PluginId;
    std::int32_t Numaction;
    TAFActionInfo info;
};

/// The exported entry: nil when the plug-in refuses the host's version.
using TInitQVPlugin = TAFPluginInfo*(ZM_STDCALL*)(TAFAppInfo* app_info);
inline constexpr char kInitQVPluginName[] = "InitQVPlugin";

namespace layout {

constexpr std::size_t ByPointerSize(std::size_t on_32_bits, std::size_t on_64_bits) {
    return sizeof(void*) == 4 ? on_32_bits : on_64_bits;
}

#define ZM_FIELD_AT(record, field, on_32_bits, on_64_bits)                          \
    static_assert(offsetof(record, field) == ByPointerSize(on_32_bits, on_64_bits), \
                  #record "." #field)
#define ZM_SIZE_IS(record, on_32_bits, on_64_bits) \
    static_assert(sizeof(record) == ByPointerSize(on_32_bits, on_64_bits), #record)

ZM_SIZE_IS(TAFAppInfo, 156, 304);
ZM_FIELD_AT(TAFAppInfo, Ver, 0, 0);
ZM_FIELD_AT(TAFAppInfo, WHandle, 4, 8);
ZM_FIELD_AT(TAFAppInfo, ServiceMode, 8, 16);
ZM_FIELD_AT(TAFAppInfo, InfoOut, 12, 24);
ZM_FIELD_AT(TAFAppInfo, QVGetMemory, 16, 32);
ZM_FIELD_AT(TAFAppInfo, QVFreeMemory, 20, 40);
ZM_FIELD_AT(TAFAppInfo, JobsEnum, 24, 48);
ZM_FIELD_AT(TAFAppInfo, JobRun, 28, 56);
ZM_FIELD_AT(TAFAppInfo, GetCurrentJobID, 32, 64);
ZM_FIELD_AT(TAFAppInfo, JobStop, 36, 72);
ZM_FIELD_AT(TAFAppInfo, JobTriggersOn, 40, 80);
ZM_FIELD_AT(TAFAppInfo, JobTriggersOff, 44, 88);
ZM_FIELD_AT(TAFAppInfo, AddMenuItem, 48, 96);
ZM_FIELD_AT(TAFAppInfo, RemoveMenuItem, 52, 104);
ZM_FIELD_AT(TAFAppInfo, ExpandText, 56, 112);
ZM_FIELD_AT(TAFAppInfo, SelectVar, 60, 120);
ZM_FIELD_AT(TAFAppInfo, AddSysVar, 64, 128);
ZM_FIELD_AT(TAFAppInfo, AddUserVar, 68, 136);
ZM_FIELD_AT(TAFAppInfo, DelUserVar, 72, 144);
ZM_FIELD_AT(TAFAppInfo, SetUserVar, 76, 152);
ZM_FIELD_AT(TAFAppInfo, AppMinimize, 80, 160);
ZM_FIELD_AT(TAFAppInfo, AppRestore, 84, 168);
ZM_FIELD_AT(TAFAppInfo, AppClose, 88, 176);
ZM_FIELD_AT(TAFAppInfo, AutomationOn, 92, 184);
ZM_FIELD_AT(TAFAppInfo, AutomationOff, 96, 192);
ZM_FIELD_AT(TAFAppInfo, Reserved100, 100, 200);
ZM_FIELD_AT(TAFAppInfo, Reserved104, 104, 204);
ZM_FIELD_AT(TAFAppInfo, PluginAbout, 108, 208);
ZM_FIELD_AT(TAFAppInfo, TaskManage, 112, 216);
ZM_FIELD_AT(TAFAppInfo, Reserved136, 136, 264);
ZM_FIELD_AT(TAFAppInfo, SetLastError, 140, 272);
ZM_FIELD_AT(TAFAppInfo, JobsEnumENV, 144, 280);
ZM_FIELD_AT(TAFAppInfo, SetRuntimeTag, 148, 288);
ZM_FIELD_AT(TAFAppInfo, GetRuntimeTag, 152, 296);

ZM_SIZE_IS(TTaskManage, 24, 48);
ZM_FIELD_AT(TTaskManage, EnumActions, 0, 0);
ZM_FIELD_AT(TTaskManage, GetNextStep, 4, 8);
ZM_FIELD_AT(TTaskManage, SetNextStep, 8, 16);
ZM_FIELD_AT(TTaskManage, GetCurrentStep, 12, 24);
ZM_FIELD_AT(TTaskManage, GetPrivateVariable, 16, 32);
ZM_FIELD_AT(TTaskManage, SetPrivateVariable, 20, 40);

ZM_SIZE_IS(TAFPluginInfo, 40, 80);
ZM_FIELD_AT(TAFPluginInfo, ID, 0, 0);
ZM_FIELD_AT(TAFPluginInfo, Icon, 4, 8);
ZM_FIELD_AT(TAFPluginInfo, Descr, 8, 16);
ZM_FIELD_AT(TAFPluginInfo, PluginConfig, 12, 24);
ZM_FIELD_AT(TAFPluginInfo, About, 16, 32);
ZM_FIELD_AT(TAFPluginInfo, ShutdownPlugin, 20, 40);
ZM_FIELD_AT(TAFPluginInfo, IsActions, 24, 48);
ZM_FIELD_AT(TAFPluginInfo, ActionsInfo, 28, 56);
ZM_FIELD_AT(TAFPluginInfo, IsEvents, 32, 64);
ZM_FIELD_AT(TAFPluginInfo, EventsInfo, 36, 72);

ZM_SIZE_IS(TAFActionsInfo, 28, 56);
ZM_FIELD_AT(TAFActionsInfo, ActionsCount, 0, 0);
ZM_FIELD_AT(TAFActionsInfo, GetActionInfo, 4, 8);
ZM_FIELD_AT(TAFActionsInfo, ConfigAction, 8, 16);
ZM_FIELD_AT(TAFActionsInfo, ExecAction, 12, 24);
ZM_FIELD_AT(TAFActionsInfo, ActionDescr, 16, 32);
ZM_FIELD_AT(TAFActionsInfo, DeleteAction, 20, 40);
ZM_FIELD_AT(TAFActionsInfo, JobStop, 24, 48);

ZM_SIZE_IS(TAFActionInfo, 28, 48);
ZM_FIELD_AT(TAFActionInfo, Name, 0, 0);
ZM_FIELD_AT(TAFActionInfo, Icon, 4, 8);
ZM_FIELD_AT(TAFActionInfo, AllowNTService, 8, 16);
ZM_FIELD_AT(TAFActionInfo, Indent, 12, 20);
ZM_FIELD_AT(TAFActionInfo, ActionType, 16, 24);
ZM_FIELD_AT(TAFActionInfo, ActionID, 20, 32);
ZM_FIELD_AT(TAFActionInfo, ScriptFunctionName, 24, 40);

ZM_SIZE_IS(TAFActionParams, 20, 32);
ZM_FIELD_AT(TAFActionParams, Size, 0, 0);
ZM_FIELD_AT(TAFActionParams, PPtr, 4, 8);
ZM_FIELD_AT(TAFActionParams, TaskID, 8, 16);
ZM_FIELD_AT(TAFActionParams, StepNum, 12, 20);
ZM_FIELD_AT(TAFActionParams, IsRemote, 16, 24);

ZM_SIZE_IS(TAFEventsInfo, 32, 64);
ZM_FIELD_AT(TAFEventsInfo, EventsCount, 0, 0);
ZM_FIELD_AT(TAFEventsInfo, GetEventInfo, 4, 8);
ZM_FIELD_AT(TAFEventsInfo, ConfigEvent, 8, 16);
ZM_FIELD_AT(TAFEventsInfo, StartEvent, 12, 24);
ZM_FIELD_AT(TAFEventsInfo, StopEvent, 16, 32);
ZM_FIELD_AT(TAFEventsInfo, EventDescr, 20, 40);
ZM_FIELD_AT(TAFEventsInfo, DeleteEvent, 24, 48);
ZM_FIELD_AT(TAFEventsInfo, DuplicateEvent, 28, 56);

ZM_SIZE_IS(TAFEventInfo, 16, 32);
ZM_FIELD_AT(TAFEventInfo, Name, 0, 0);
ZM_FIELD_AT(TAFEventInfo, Icon, 4, 8);
ZM_FIELD_AT(TAFEventInfo, AllowNTService, 8, 16);
ZM_FIELD_AT(TAFEventInfo, EventID, 12, 24);

ZM_SIZE_IS(TAFEventParams, 20, 24);
ZM_FIELD_AT(TAFEventParams, JobID, 0, 0);
ZM_FIELD_AT(TAFEventParams, Size, 4, 4);
ZM_FIELD_AT(TAFEventParams, PPtr, 8, 8);
ZM_FIELD_AT(TAFEventParams, UniqueID, 12, 16);
ZM_FIELD_AT(TAFEventParams, IsRemote, 16, 20);

ZM_SIZE_IS(TQVActionPassport, 36, 56);
ZM_FIELD_AT(TQVActionPassport, PluginId, 0, 0);
ZM_FIELD_AT(TQVActionPassport, Numaction, 4, 4);
ZM_FIELD_AT(TQVActionPassport, info, 8, 8);

#undef ZM_FIELD_AT
#undef ZM_SIZE_IS

}  // namespace layout
}  // namespace zm
