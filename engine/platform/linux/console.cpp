#include "engine/platform/console.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>

namespace zm::platform {
namespace {

void WriteWhole(const std::string& text, std::FILE* file) {
    std::fwrite(text.data(), 1, text.size(), file);
    std::fflush(file);
}

}  // namespace

std::vector<std::string> ProgramArguments(int argc, char** argv) {
    return {argv, argv + argc};
}

bool StderrIsTerminal() {
    return ::isatty(STDERR_FILENO) == 1;
}

void WriteStdout(const std::string& text) {
    WriteWhole(text, stdout);
}

void WriteStderr(const std::string& text) {
    WriteWhole(text, stderr);
}

std::optional<std::string> EnvironmentVariable(const std::string& name) {
    const char* const value = std::getenv(name.c_str());
    return value == nullptr ? std::nullopt : std::optional<std::string>(value);
}

std::string LocaleName() {
    for (const char* const name : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
        const std::string value = EnvironmentVariable(name).value_or("");
        if (!value.empty()) {
            const std::string locale = value.substr(0, value.find_first_of(".@"));
            return locale == "C" || locale == "POSIX" ? std::string() : locale;
        }
    }
    return {};
}

}  // namespace zm::platform
