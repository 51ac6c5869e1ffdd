#include "host/qvjobfile.h"

#include "engine/foundation/zmstrings.h"

namespace zm::qvrun {
namespace {

constexpr std::u16string_view kBlanks = u" \t";

std::u16string_view Trimmed(std::u16string_view text) {
    const auto first = text.find_first_not_of(kBlanks);
    if (first == std::u16string_view::npos) {
        return {};
    }
    return text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

bool RefersToInputFile(std::u16string_view value) {
    for (const auto name : {u"{file}", u"{dir}", u"{name}", u"{ext}"}) {
        if (value.find(name) != std::u16string_view::npos) {
            return true;
        }
    }
    return false;
}

TJobLine FaultyLine(const char* message) {
    return {jlFault, {}, message};
}

/// Adds one line to the job; the message of the fault, or empty.
std::string AddLine(std::u16string_view line, std::int32_t number, TJobFile& job) {
    TJobLine read = ReadJobLine(line);
    if (read.kind == jlHead) {
        job.steps.push_back({std::move(read.action), {}, number});
    } else if (read.kind == jlSetting && job.steps.empty()) {
        return "a key stands before the first section";
    } else if (read.kind == jlSetting) {
        job.uses_input_file = job.uses_input_file || RefersToInputFile(line);
        job.steps.back().text.append(line).append(u"\r\n");
    }
    return read.fault;
}

}  // namespace

TJobLine ReadJobLine(std::u16string_view line) {
    const std::u16string_view trimmed = Trimmed(line);
    if (trimmed.empty() || trimmed.front() == u'#' || trimmed.front() == u';') {
        return {};
    }
    if (trimmed.front() != u'[') {
        return line.find(u'=') == std::u16string_view::npos
                   ? FaultyLine("expected \"[action]\" or \"key=value\"")
                   : TJobLine{jlSetting, {}, {}};
    }
    if (trimmed.back() != u']') {
        return FaultyLine("a section head must end in \"]\"");
    }
    const std::u16string_view action = Trimmed(trimmed.substr(1, trimmed.size() - 2));
    return action.empty() ? FaultyLine("a section head must name an action")
                          : TJobLine{jlHead, std::u16string(action), {}};
}

bool ParseJobText(std::string_view text, TJobFile& job, TJobFileError& error) {
    job = {};
    if (text.starts_with(kByteOrderMark)) {
        text.remove_prefix(kByteOrderMark.size());
    }
    if (text.find('\0') != std::string_view::npos) {
        error = {0, "not a text file"};
        return false;
    }
    std::int32_t number = 0;
    for (const std::u16string& line : SplitLines(Utf16FromUtf8(text))) {
        ++number;
        std::string fault = AddLine(line, number, job);
        if (!fault.empty()) {
            error = {number, std::move(fault)};
            return false;
        }
    }
    if (job.steps.empty()) {
        error = {0, "the job has no step"};
        return false;
    }
    return true;
}

}  // namespace zm::qvrun
