#include "plugin/uQVPluginUtils.h"

#include <algorithm>
#include <new>

#include "engine/foundation/zmstrings.h"
#include "plugin/AFPlugin.h"

namespace zm {
namespace {

constexpr std::u16string_view kLineEnd = u"\r\n";

std::vector<std::u16string> LinesOf(const void* block) {
    return block == nullptr ? std::vector<std::u16string>()
                            : SplitLines(static_cast<const char16_t*>(block));
}

/// Key of a line; a null view (data() is nil) when the line has no equals sign.
std::u16string_view KeyOf(std::u16string_view line) {
    const std::size_t sign = line.find(u'=');
    return sign == std::u16string_view::npos ? std::u16string_view() : line.substr(0, sign);
}

bool HasKey(std::u16string_view line, std::u16string_view key) {
    const std::u16string_view own = KeyOf(line);
    return own.data() != nullptr && KeysEqualNoCase(own, key);
}

/// Number after `prefix` in a key such as name_12: no sign, no leading zeros; -1 for other keys.
std::int32_t ListIndex(std::u16string_view key, std::u16string_view prefix) {
    if (key.size() <= prefix.size() || !KeysEqualNoCase(key.substr(0, prefix.size()), prefix)) {
        return -1;
    }
    const std::u16string_view digits = key.substr(prefix.size());
    const std::int32_t index = ParseInteger(digits).value_or(-1);
    return index >= 0 && IntegerToText(index) == digits ? index : -1;
}

}  // namespace

TQVPluginParams::TQVPluginParams(const TAFActionParams& params)
    : FList(LinesOf(params.PPtr)),
      FParamsType(ptAction),
      FTaskId(static_cast<std::int32_t>(params.TaskID)),
      FSTepNum(params.StepNum),
      FIsRemote(params.IsRemote != kLongFalse) {}

TQVPluginParams::TQVPluginParams(const TAFEventParams& params)
    : FList(LinesOf(params.PPtr)),
      FParamsType(ptEvent),
      FTaskId(params.JobID),
      FUniqueId(static_cast<std::int32_t>(params.UniqueID)),
      FIsRemote(params.IsRemote != kLongFalse) {}

TQVPluginParams::TLines::const_iterator TQVPluginParams::FindLine(std::u16string_view key) const {
    return std::find_if(FList.begin(), FList.end(),
                        [key](const std::u16string& line) { return HasKey(line, key); });
}

bool TQVPluginParams::ParamExist(std::u16string_view key) const {
    return FindLine(key) != FList.end();
}

std::u16string TQVPluginParams::GetString(std::u16string_view key) const {
    return GetStringDef(key, {});
}

std::u16string TQVPluginParams::GetStringDef(std::u16string_view key,
                                             std::u16string_view default_value) const {
    const auto line = FindLine(key);
    return line == FList.end() ? std::u16string(default_value) : line->substr(line->find(u'=') + 1);
}

std::int32_t TQVPluginParams::GetInteger(std::u16string_view key) const {
    return GetIntegerDef(key, 0);
}

std::int32_t TQVPluginParams::GetIntegerDef(std::u16string_view key,
                                            std::int32_t default_value) const {
    return ParseInteger(GetString(key)).value_or(default_value);
}

bool TQVPluginParams::GetBool(std::u16string_view key) const {
    return GetBoolDef(key, false);
}

bool TQVPluginParams::GetBoolDef(std::u16string_view key, bool default_value) const {
    const std::u16string value = GetString(key);
    // Required: a value that is there but is no integer counts as 0, whatever the default.
    return value.empty() ? default_value : ParseInteger(value).value_or(0) != 0;
}

std::u16string TQVPluginParams::GetStrings(std::u16string_view key) const {
    return GetStringsDef(key, {});
}

std::u16string TQVPluginParams::GetStringsDef(std::u16string_view key,
                                              std::u16string_view default_value) const {
    const std::u16string prefix = std::u16string(key) + u"_";
    const std::int32_t count = std::clamp(GetInteger(prefix + u"count"), 0, kMaxListItems);
    // One walk over the lines instead of one per item.
    std::vector<const std::u16string*> items(static_cast<std::size_t>(count), nullptr);
    for (const std::u16string& line : FList) {
        const std::int32_t index = ListIndex(KeyOf(line), prefix);
        if (index >= 0 && index < count && items[static_cast<std::size_t>(index)] == nullptr) {
            items[static_cast<std::size_t>(index)] = &line;
        }
    }
    std::u16string result;
    for (const std::u16string* line : items) {
        if (!result.empty()) {
            result += kLineEnd;
        }
        if (line != nullptr) {
            result.append(*line, line->find(u'=') + 1);
        }
    }
    return result.empty() ? std::u16string(default_value) : result;
}

void TQVPluginParams::SetInteger(std::u16string_view key, std::int32_t value) {
    SetString(key, IntegerToText(value));
}

void TQVPluginParams::SetString(std::u16string_view key, std::u16string_view value) {
    const auto line = FList.begin() + (FindLine(key) - FList.cbegin());
    if (value.empty()) {
        if (line != FList.end()) {
            FList.erase(line);
        }
    } else if (line != FList.end()) {
        line->replace(line->find(u'=') + 1, std::u16string::npos, value);
    } else {
        FList.push_back(std::u16string(key).append(u"=").append(value));
    }
}

void TQVPluginParams::SetBool(std::u16string_view key, bool value) {
    SetInteger(key, value ? 1 : 0);
}

void TQVPluginParams::SetStrings(std::u16string_view key,
                                 const std::vector<std::u16string>& values) {
    const std::u16string prefix = std::u16string(key) + u"_";
    SetInteger(prefix + u"count", static_cast<std::int32_t>(values.size()));
    for (std::size_t index = 0; index < values.size(); ++index) {
        SetString(prefix + IntegerToText(static_cast<std::int64_t>(index)), values[index]);
    }
}

void TQVPluginParams::WriteBlock(std::int32_t& size, void*& block) const {
    if (size != 0 && block != nullptr) {
        HostFreeMemory(&block, size);
    }
    size = 0;
    block = nullptr;
    std::u16string text;
    for (const std::u16string& line : FList) {
        text.append(line).append(kLineEnd);
    }
    const std::size_t bytes = (text.size() + 1) * sizeof(char16_t);
    if (bytes > static_cast<std::size_t>(INT32_MAX)) {
        throw std::bad_alloc();
    }
    HostGetMemory(&block, static_cast<std::int32_t>(bytes));
    size = static_cast<std::int32_t>(bytes);
    std::copy_n(text.c_str(), text.size() + 1, static_cast<char16_t*>(block));
}

void TQVPluginParams::ToActionParams(TAFActionParams& params) const {
    if (FParamsType != ptAction) {
        throw EPluginException("This is NOT action parameters");
    }
    WriteBlock(params.Size, params.PPtr);
}

void TQVPluginParams::ToEventParams(TAFEventParams& params) const {
    if (FParamsType != ptEvent) {
        throw EPluginException("This is NOT triggering event parameters");
    }
    WriteBlock(params.Size, params.PPtr);
}

}  // namespace zm
