#include "host/qvvariables.h"

#include <algorithm>
#include <optional>

#include "engine/foundation/zmstrings.h"
#include "engine/platform/clock.h"
#include "engine/platform/console.h"

namespace zm::qvrun {
namespace {

constexpr std::u16string_view kEnvironmentPrefix = u"env:";

/// The folder without its trailing separator, "." for none, so that "{dir}/x" always works.
std::u16string FolderValue(const std::u16string& file) {
    std::u16string folder = FileFolder(file);
    if (folder.empty()) {
        return u".";
    }
    if (folder.size() > 1) {
        folder.pop_back();
    }
    return folder;
}

std::u16string NameValue(const std::u16string& file) {
    const std::u16string base = FileBaseName(file);
    return base.substr(0, base.size() - FileExtension(file).size());
}

std::u16string ExtensionValue(const std::u16string& file) {
    const std::u16string extension = FileExtension(file);
    return extension.empty() ? extension : extension.substr(1);
}

std::optional<std::u16string> VariableValue(std::u16string_view name,
                                            const TJobVariables& variables) {
    if (const auto found = variables.user.find(std::u16string(name));
        found != variables.user.end()) {
        return found->second;
    }
    if (name == u"file")
        return variables.file;
    if (name == u"dir")
        return FolderValue(variables.file);
    if (name == u"name")
        return NameValue(variables.file);
    if (name == u"ext")
        return ExtensionValue(variables.file);
    if (name == u"out")
        return variables.out;
    if (name == u"index")
        return IntegerToText(variables.index);
    if (name == u"date")
        return variables.date;
    if (name == u"time")
        return variables.time;
    if (name.starts_with(kEnvironmentPrefix)) {
        const auto value =
            platform::EnvironmentVariable(Utf8FromUtf16(name.substr(kEnvironmentPrefix.size())));
        return Utf16FromUtf8(value.value_or(""));
    }
    return std::nullopt;
}

/// The number with leading zeros.
std::u16string Digits(std::int32_t number, std::size_t width) {
    const std::u16string text = IntegerToText(number);
    return text.size() < width ? std::u16string(width - text.size(), u'0') + text : text;
}

}  // namespace

const std::vector<TVariableInfo>& KnownVariables() {
    static const std::vector<TVariableInfo> variables{
        {u"{file}", u"the picture that the job runs for"},
        {u"{dir}", u"its folder"},
        {u"{name}", u"its name without folder and extension"},
        {u"{ext}", u"its extension without the dot"},
        {u"{out}", u"the output folder (--output)"},
        {u"{index}", u"number of the picture, from 1"},
        {u"{date}", u"date at the start, as 2026-11-21"},
        {u"{time}", u"time at the start, as 14-05-09"},
        {u"{env:HOME}", u"a variable of the environment, here HOME"},
    };
    return variables;
}

void SetVariablesClock(TJobVariables& variables) {
    const platform::TLocalTime now = platform::LocalNow();
    variables.date = Digits(now.year, 4) + u"-" + Digits(now.month, 2) + u"-" + Digits(now.day, 2);
    variables.time =
        Digits(now.hour, 2) + u"-" + Digits(now.minute, 2) + u"-" + Digits(now.second, 2);
}

std::u16string ExpandJobText(std::u16string_view text, const TJobVariables& variables) {
    std::u16string result;
    std::size_t position = 0;
    while (position < text.size()) {
        const std::size_t open = text.find(u'{', position);
        const std::size_t close = open == std::u16string_view::npos ? open : text.find(u'}', open);
        if (close == std::u16string_view::npos) {
            break;
        }
        result.append(text.substr(position, open - position));
        const auto value = VariableValue(text.substr(open + 1, close - open - 1), variables);
        if (value) {
            result.append(*value);
            position = close + 1;
        } else {
            result.push_back(u'{');
            position = open + 1;
        }
    }
    return result.append(text.substr(std::min(position, text.size())));
}

}  // namespace zm::qvrun
