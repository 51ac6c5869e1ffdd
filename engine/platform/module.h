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

}  // namespace zm::platform
