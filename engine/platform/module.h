#pragma once

#include <memory>
#include <string>

namespace zm::platform {

/// Path of the file (module or program) that holds `address`; empty when unknown.
std::u16string ModulePathOf(const void* address);
/// Path of the running program; empty when unknown.
std::u16string ProgramPath();

/// A dynamic library, unloaded with the object.
class TLibrary {
public:
    virtual ~TLibrary() = default;
    /// Address of an exported name, or nil.
    virtual void* FindSymbol(const char* name) = 0;
};

/// Loads a library by path; nil on failure with the system's reason in `error_text`.
std::unique_ptr<TLibrary> LoadLibraryFile(const std::u16string& path, std::string& error_text);

/// Loads a library that the system or the program brings, by its file name alone. It is looked
/// for in the system's folders and in the program's, never in the current one.
std::unique_ptr<TLibrary> LoadInstalledLibrary(const std::string& file_name,
                                               std::string& error_text);

}  // namespace zm::platform
