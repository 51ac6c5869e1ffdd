#pragma once

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

/// Runs a program of the build as a user would.
namespace zm::test {

struct TProcessResult {
    int exit_status = -1;
    std::string standard_output;
    std::string standard_error;
};

inline std::string ReadWholeText(const std::filesystem::path& name) {
    std::ifstream file(name, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), std::istreambuf_iterator<char>()};
}

/// `command` is a command line without redirections; texts are captured in `folder`. Names in it
/// must not need quoting.
inline TProcessResult RunProcess(const std::string& command, const std::filesystem::path& folder) {
    const std::filesystem::path out = folder / "stdout.txt";
    const std::filesystem::path err = folder / "stderr.txt";
    const int status = std::system((command + " >" + out.string() + " 2>" + err.string()).c_str());
    TProcessResult result;
#ifdef WEXITSTATUS
    result.exit_status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
#else
    result.exit_status = status;
#endif
    result.standard_output = ReadWholeText(out);
    result.standard_error = ReadWholeText(err);
    return result;
}

}  // namespace zm::test
