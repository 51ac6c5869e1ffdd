// Parameter texts: any zero-terminated UTF-16 is parsed, described by all actions, written back
// and parsed again.
#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>

#include "plugin/AFPlugin.h"
#include "plugin/uGraphicsDM.h"

namespace {

constexpr std::size_t kMaxBytes = 1 << 16;

void ZM_STDCALL GetMemory(void** block, std::int32_t size_bytes) {
    *block = std::malloc(static_cast<std::size_t>(size_bytes));
}

void ZM_STDCALL FreeMemory(void** block, std::int32_t) {
    std::free(*block);
    *block = nullptr;
}

void Require(bool holds) {
    if (!holds) {
        std::abort();
    }
}

/// The plug-in with a host of two callbacks; no step is run that needs more.
zm::TAFPluginInfo* StartedPlugin() {
    static zm::TAFPluginInfo* const info = [] {
        zm::TAFAppInfo host{};
        host.Ver = u"8.3";
        host.QVGetMemory = &GetMemory;
        host.QVFreeMemory = &FreeMemory;
        return zm::StartPlugin(&host);
    }();
    return info;
}

void DescribeAll(zm::TAFActionParams& params) {
    const zm::TAFActionsInfo& actions = *StartedPlugin()->ActionsInfo;
    for (std::int32_t index = 0; index < actions.ActionsCount; ++index) {
        char16_t buffer[zm::kDescriptionBufferLength];
        std::fill(std::begin(buffer), std::end(buffer), u'\xFFFF');
        actions.ActionDescr(index, &params, buffer);
        Require(std::find(std::begin(buffer), std::end(buffer), u'\0') != std::end(buffer));
    }
}

/// What a form does: a list and single values of every kind.
void ReadAll(const zm::TQVPluginParams& params) {
    Require(params.GetStringDef(u"image_file", u"?") ==
            (params.ParamExist(u"image_file") ? params.GetString(u"image_file") : u"?"));
    Require(params.GetIntegerDef(u"l", 0) == params.GetInteger(u"l"));
    Require(params.GetBoolDef(u"save_meta", false) == params.GetBool(u"save_meta"));
    Require(params.GetStringsDef(u"name", u"").size() <= 2 * kMaxBytes + 2 * zm::kMaxListItems);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    if (size > kMaxBytes) {
        return 0;
    }
    std::u16string text(size / 2, u'\0');
    if (!text.empty()) {
        std::memcpy(text.data(), data, text.size() * sizeof(char16_t));
    }
    zm::TAFActionParams params{};
    params.PPtr = text.data();
    StartedPlugin();
    DescribeAll(params);
    const zm::TQVPluginParams step(params);
    ReadAll(step);

    // What was written reads as the same lines, and is then written the same.
    zm::TAFActionParams first{};
    step.ToActionParams(first);
    const zm::TQVPluginParams again(first);
    ReadAll(again);
    Require(again.GetString(u"image_file") == step.GetString(u"image_file"));
    Require(again.GetInteger(u"color") == step.GetInteger(u"color"));
    zm::TAFActionParams second{};
    again.ToActionParams(second);
    Require(first.Size == second.Size);
    Require(std::memcmp(first.PPtr, second.PPtr, static_cast<std::size_t>(first.Size)) == 0);
    FreeMemory(&first.PPtr, first.Size);
    FreeMemory(&second.PPtr, second.Size);
    return 0;
}
