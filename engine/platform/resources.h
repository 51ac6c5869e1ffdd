#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace zm::platform {

/// Name of a resource or of a type: a number, or a text.
struct TResourceName {
    bool is_number = true;
    std::uint32_t number = 0;
    std::u16string text;
};

/// One resource. Of several languages the first in the module counts.
struct TResource {
    TResourceName name;
    std::uint32_t data_address = 0;  ///< for the module's own use
    std::uint32_t data_bytes = 0;    ///< as the module tells it, not yet looked for
};

struct TResourceType {
    TResourceName name;
    std::vector<TResource> resources;
};

/// Resources of a Windows module (program, library) that is open as data: it is never run and
/// need not fit the machine. Not thread-safe.
class TResourceModule {
public:
    virtual ~TResourceModule() = default;
    /// The types in the module's own order; none without resources. A faulty directory gives the
    /// entries that can be read.
    virtual std::vector<TResourceType> ReadTypes() = 0;
    /// The bytes of a resource of this module, `data_bytes` of them; none when they do not lie in
    /// it.
    virtual std::vector<std::uint8_t> ReadData(const TResource& resource) = 0;
};

/// Nil for a file that cannot be read or, as far as that shows already, is no module.
std::unique_ptr<TResourceModule> OpenResourceModule(const std::u16string& file_name);

}  // namespace zm::platform
