#pragma once

#include <optional>
#include <string>
#include <vector>

/// Terminal, arguments and environment of a program; texts are UTF-8.
namespace zm::platform {

/// The program's arguments in UTF-8, the program's name first. On Windows they come from the
/// system's wide command line.
std::vector<std::string> ProgramArguments(int argc, char** argv);
/// Whether standard error is a terminal.
bool StderrIsTerminal();
/// Writes UTF-8 text, converted for a console where the system needs it.
void WriteStdout(const std::string& text);
void WriteStderr(const std::string& text);
/// Value of an environment variable, or nothing.
std::optional<std::string> EnvironmentVariable(const std::string& name);
/// The user's locale name, such as "en_US" or "de-DE"; empty when unknown.
std::string LocaleName();

}  // namespace zm::platform
